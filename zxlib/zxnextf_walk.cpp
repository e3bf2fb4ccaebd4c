// zxnextf_walk.cpp - the walk over the names that patterns stand for.
// Tests: tests/zxlib/zxnextf_test.cpp.

#include <algorithm>

#include "zxaa.h"
#include "zxnextf.h"
#include "zxplat.h"

namespace {

using zxplat::FolderEntry;
using zxplat::FolderReader;

constexpr std::int32_t k_read_buffer = 16384;

enum class Wanted { files, files_and_folders, own_folders };

bool has_wildcard(const zxStr& text) {
  return text.view().find_first_of("*?") != std::string_view::npos;
}

bool is_wanted(const FolderEntry& entry, Wanted wanted) {
  switch (wanted) {
    case Wanted::files:
      return !entry.is_folder;
    case Wanted::files_and_folders:
      return true;
    case Wanted::own_folders:  // links could lead around in circles
      return entry.is_folder && !entry.is_link;
  }
  return false;
}

bool holds_capitals(std::string_view text) {
  return std::any_of(text.begin(), text.end(),
                     [](char c) { return zx_is(c, k_class_upper); });
}

// Leaves only the first of names that are alike.
void drop_repetitions(zxQVA<zxStr>& names) {
  zxSA<bool> known;
  std::int32_t kept = 0;
  for (const zxStr& name : names) {
    bool& is_known = known.ref(name);
    if (is_known) continue;
    is_known = true;
    names.get(kept++) = name;
  }
  names.set_length(kept);
}

// The folder's part of the names that are found in it: in lower case, unless
// that is the name of another folder, where the system tells case apart.
zxStr prefix_of(const zxStr& folder) {
  const zxStr prefix = with_slash(folder);
  if (!holds_capitals(prefix.view())) return prefix;
  zxStr lowered = prefix;
  lowered.to_lower();
  const bool is_other =
      zxplat::kind_of(lowered.view()) == zxplat::NameKind::directory &&
      !zxplat::same_file(lowered.view(), prefix.view());
  return is_other ? prefix : lowered;
}

// A name in lower case behind a folder's part.
zxStr path_of(const zxStr& prefix, std::string_view name) {
  zxStr lowered(name);
  lowered.to_lower();
  return prefix + lowered;
}

// The paths of a folder's entries whose names match.  Two entries can come
// out alike in lower case: a name in capitals must have been among them.
void list_folder(const zxStr& folder, const zxStr& pattern, Wanted wanted,
                 zxQVA<zxStr>& out) {
  const zxStr prefix = prefix_of(folder);
  bool any_capitals = false;
  FolderReader reader(folder.view());
  for (FolderEntry entry; reader.next(entry);) {
    if (!is_wanted(entry, wanted)) continue;
    if (!name_matches(pattern.view(), entry.name)) continue;
    any_capitals = any_capitals || holds_capitals(entry.name);
    out.append(path_of(prefix, entry.name));
  }
  if (any_capitals) drop_repetitions(out);
}

// Puts the elements from `from` on in front of a list, in their order.
void put_in_front(zxQVA<zxStr>& list, const zxQVA<zxStr>& elements,
                  std::int32_t from) {
  const std::int32_t count = elements.length() - from;
  list.grow_front(count);
  for (std::int32_t i = 0; i < count; ++i) list.get(i) = elements.get(from + i);
}

// The same specification for each folder below that of `path`.
void put_subfolders_in_front(zxQVA<zxStr>& list, const zxPath& path) {
  zxQVA<zxStr> found;
  list_folder(path.dir, "*", Wanted::own_folders, found);
  for (zxStr& folder : found) folder.append("\\\\").append(path.name);
  put_in_front(list, found, 0);
}

// The names that one specification stands for.
void expand(const zxPath& path, bool with_dirs, zxQVA<zxStr>& out) {
  if (path.recursive || has_wildcard(path.path)) {
    const Wanted wanted = with_dirs ? Wanted::files_and_folders : Wanted::files;
    list_folder(path.dir, path.name, wanted, out);
  }
  if (out.length() == 0 && !path.recursive) out.append(path.path);
}

// Takes the first specification from the list, and puts the names that it
// stands for in its place, but for the first: that is the result, unless it
// is a pattern that matched nothing.
bool take_next(zxQVA<zxStr>& list, bool with_dirs, zxStr& name) {
  const zxStr specification = list.pop_first();
  if (specification.is_empty()) return false;
  const zxPath path(specification);
  if (path.recursive) put_subfolders_in_front(list, path);
  zxQVA<zxStr> found;
  expand(path, with_dirs, found);
  if (found.length() == 0) return false;
  put_in_front(list, found, 1);
  name = found.get(0);
  return !has_wildcard(name);
}

void report_not_opened(const zxStr& name) {
  g_stderr.puts(zxStr("Can't open file ") + name + "\r\n");
}

}  // namespace

// Behind a "*" the shortest match is tried first; when the rest does not fit,
// the last "*" takes one byte more.
bool name_matches(std::string_view pattern, std::string_view name) {
  if (pattern.empty()) return false;
  if (pattern == "*.*") return true;
  std::size_t p = 0;
  std::size_t n = 0;
  std::size_t star = std::string_view::npos;
  std::size_t star_end = 0;  // where what the last "*" took ends
  while (n < name.size()) {
    if (p < pattern.size() && pattern[p] == '*') {
      star = p++;
      star_end = n;
    } else if (p < pattern.size() &&
               (pattern[p] == '?' ||
                zx_lower(pattern[p]) == zx_lower(name[n]))) {
      ++p;
      ++n;
    } else if (star != std::string_view::npos) {
      p = star + 1;
      n = ++star_end;
    } else {
      return false;
    }
  }
  return pattern.find_first_not_of('*', p) == std::string_view::npos;
}

bool next_file(zxQVA<zxStr>& list, zxStr& name, bool with_dirs) {
  while (list.length() > 0)
    if (take_next(list, with_dirs, name)) return true;
  return false;
}

void all_files_of(zxQVA<zxStr>& list, zxQVA<zxStr>& out) {
  for (zxStr name; next_file(list, name);) out.append(name);
}

bool open_next(zxBFile& file, zxQVA<zxStr>& list) {
  file.close(no_detail);
  for (zxStr name; next_file(list, name);) {
    if (file.open(name)) {
      file.set_buffer(k_read_buffer);
      return true;
    }
    report_not_opened(name);
  }
  return false;
}
