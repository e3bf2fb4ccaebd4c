// zxnextf.cpp - path names and unique names.
// Tests: tests/zxlib/zxnextf_test.cpp.
#include "zxnextf.h"

#include "zxplat.h"
#include "zxtext.h"

namespace {

// A component of this length makes a name illegal.
constexpr std::int32_t k_too_long = 215;

constexpr int k_name_tries = 30;

// Names made by this process.
constinit std::uint32_t names_made = 0;

constexpr bool is_separator(char c) { return c == '\\' || c == '/'; }

constexpr bool is_illegal(char c) {
  return std::string_view("\"*:<>?|").find(c) != std::string_view::npos;
}

// True for what keeps its final backslash: "\" and "X:\".
bool is_root(std::string_view path) {
  return path == "\\" ||
         (path.size() == 3 && path_has_drive(path) && path[2] == '\\');
}

// True if the part of a name behind drive or server has legal syntax.
bool is_valid(std::string_view text) {
  std::int32_t components = 0;
  std::int32_t bytes = 0;
  for (const char c : text) {
    if (is_separator(c)) {
      if (bytes == 0 && components > 0) return false;
      ++components;
      bytes = 0;
    } else if (is_illegal(c) || ++bytes >= k_too_long) {
      return false;
    }
  }
  return true;
}

// A candidate for a unique name: a number from the clock and a counter.
zxStr candidate_name(const zxStr& directory, const char* extension) {
  ++names_made;
  const std::uint32_t number =
      (zxplat::process.ticks() * 9876553U + names_made) % 99991U;
  char room[12];
  zxText digits(room);
  digits.add_int(static_cast<std::int32_t>(number));
  zxStr name = with_slash(directory) + "tmp";
  name.append(room);
  name.append('.').append(extension == nullptr ? "tmp" : extension);
  const std::int32_t last = name.length() - 1;
  if (name[last] == '.') name.set_length(last);
  return name;
}

bool is_free(const zxStr& name) {
  return !zxplat::name_taken(name.view()) &&
         zxplat::last_error() == zxplat::k_err_not_found;
}

}  // namespace

// ---- taking apart

bool path_has_drive(std::string_view path) {
  return path.size() >= 2 && zx_is(path[0], k_class_latin) && path[1] == ':';
}

// Where the part behind drive or server begins.
std::int32_t zxPath::take_drive_or_server() {
  const std::string_view text = path.view();
  if (text.starts_with("\\\\")) {
    const std::size_t end = text.find_first_of("\\/", 2);
    server = zxStr(text.substr(2, end == text.npos ? end : end - 2));
    return 2 + server.length();
  }
  if (!path_has_drive(text)) return 0;
  drive_letter = zx_upper(text[0]);
  drive = drive_letter - 'A' + 1;
  return 2;
}

void zxPath::take_directory(std::int32_t start, bool is_dir) {
  dir = path;
  const std::int32_t length = dir.length();
  strip_directory();
  if (is_dir || dir.length() < length) return;
  const std::size_t last = path.view().find_last_of("\\/");
  std::int32_t cut = start;
  if (last != std::string_view::npos && zx_count(last) >= start)
    cut = zx_count(last) + 1;
  if (!ZX_ASSERT_AT(cut >= 0 && cut <= length, "zxnextf", 127)) return;
  dir = zxStr(path.c_str(), cut);
  name = zxStr(path.c_str() + cut, length - cut);
  strip_directory();
}

void zxPath::strip_directory() {
  if (strip_slash(dir) == 2) recursive = true;
}

zxPath::zxPath(const zxStr& text, bool is_dir) : path(text) {
  if (!ZX_ASSERT_AT(!text.is_empty(), "zxnextf", 93)) return;
  const std::int32_t start = take_drive_or_server();
  const std::string_view rest = text.view().substr(zx_size(start));
  if (rest.empty()) return;
  relative = !is_separator(rest[0]);
  take_directory(start, is_dir);
  valid = is_valid(rest);
}

std::int32_t strip_slash(zxStr& path) {
  std::int32_t removed = 0;
  while (path.view().ends_with('\\') && !is_root(path.view())) {
    if (!ZX_ASSERT_AT(removed < 2, "zxnextf", 261)) break;
    path.set_length(path.length() - 1);
    ++removed;
  }
  return removed;
}

bool split_path(const zxStr& path, zxStr& dir, zxStr& name) {
  const zxPath parts(path);
  dir = parts.dir;
  name = parts.name;
  return parts.recursive;
}

zxStr file_part(const zxStr& path) { return zxPath(path).name; }

zxStr dir_part(const zxStr& path) { return with_slash(zxPath(path).dir); }

bool path_valid(const zxStr& path) {
  return !path.is_empty() && zxPath(path, true).valid;
}

bool path_relative(const zxStr& path) { return zxPath(path, true).relative; }

// ---- putting together

zxStr with_slash(const zxStr& directory) {
  const std::string_view text = directory.view();
  if (text.empty() || text.back() == '\\') return directory;
  if (text.size() == 2 && path_has_drive(text)) return directory;
  if (text.back() != '/') return directory + '\\';
  zxStr result = directory;
  result.at(result.length() - 1) = '\\';
  return result;
}

zxStr path_join(const zxStr& directory, const zxStr& name) {
  const std::string_view text = name.view();
  if (text.empty() || text == ".") return with_slash(directory);
  const bool begins_here = text[0] == '.' && is_separator(text[1]);
  zxStr joined = with_slash(directory);
  if (!begins_here) return joined + name;
  return joined.append(name.c_str() + 2, name.length() - 2);
}

zxStr operator/(const zxStr& directory, const zxStr& name) {
  return path_join(directory, name);
}

zxStr operator/(const zxStr& directory, const char* name) {
  return path_join(directory, name);
}

zxStr operator/(const char* directory, const zxStr& name) {
  return path_join(directory, name);
}

zxStr& operator/=(zxStr& directory, const zxStr& name) {
  return directory = path_join(directory, name);
}

zxStr& operator/=(zxStr& directory, const char* name) {
  return directory = path_join(directory, name);
}

zxStr quote_path(const zxStr& path) {
  const std::string_view text = path.view();
  const bool is_quoted =
      text.size() >= 2 && text.front() == '"' && text.back() == '"';
  if (is_quoted || text.find(' ') == text.npos) return path;
  return '"' + path + '"';
}

// ---- unique names

bool try_uniqfile(const zxStr& directory, const char* extension, zxStr& name) {
  for (int i = 0; i < k_name_tries; ++i) {
    name = candidate_name(directory, extension);
    if (is_free(name)) return true;
  }
  return false;
}

zxUnique create_unique(zxBFile& file, zxCreateNew create,
                       const zxStr& directory, const char* extension,
                       zxStr& name) {
  for (int i = 0; i < k_name_tries; ++i) {
    if (!try_uniqfile(directory, extension, name)) return zxUnique::no_name;
    if ((file.*create)(name)) return zxUnique::created;
    if (zxplat::last_error() != zxplat::k_err_exists_on_create) break;
  }
  return zxUnique::not_created;
}
