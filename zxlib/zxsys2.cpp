// zxsys2.cpp - operations on whole files by name.
// Tests: tests/zxlib/zxsys2_test.cpp.
#include "zxsys2.h"

#include "zxbfile.h"
#include "zxplat.h"
#include "zxtext.h"

namespace {

struct State {
  zxStr temp_directory;
  std::uint32_t names_made = 0;
};
constinit State state;

constexpr int k_name_tries = 30;
constexpr std::int32_t k_copy_block = 49152;

// The text that a platform query leaves in a buffer, which is made larger
// until the text fits; an assertion with the given line fails without one.
zxStr text_of(std::size_t (*query)(std::span<char>), std::int32_t line) {
  zxStr text;
  std::size_t size = 260;
  for (;;) {
    char* room = text.buffer(zx_count(size));
    const std::size_t length = query({room, size});
    if (!ZX_ASSERT_AT(length > 0, "zxsys2", line)) return {};
    if (length < size) {
      text.set_length(zx_count(length));
      return text;
    }
    size = length + 1;
  }
}

// True if a name begins with a drive, as in "C:".
bool is_drive(const zxStr& path) {
  return zx_is(path.c_str()[0], k_class_latin) && path.c_str()[1] == ':';
}

// How far the directory of a name reaches.
std::int32_t dir_length(const zxStr& path) {
  std::int32_t n = path.length();
  for (; n > 0; --n) {
    const char last = path.c_str()[n - 1];
    if (last == '\\' || last == '/') return n;
    if (n == 2 && is_drive(path)) return n;
  }
  return 0;
}

// A candidate for a unique name: a number from the clock and a counter.
zxStr candidate_name(const zxStr& directory, const char* extension) {
  ++state.names_made;
  const std::uint32_t number =
      (zxplat::process.ticks() * 9876553U + state.names_made) % 99991U;
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

// Copies to the end of `in`.
void copy_rest(zxBFile& in, zxBFile& out) {
  zxStr block;
  char* const room = block.buffer(k_copy_block);
  std::int32_t got = 0;
  while (in.read(room, k_copy_block, &got)) out.write(room, got);
}

// Creates a file under a unique name by `create`, a member of zxBFile that
// refuses a name that is taken: another process may have taken it since it
// was found free, and then the next one is tried.  The name, also on failure.
zxStr create_unique(zxBFile& file, bool (zxBFile::*create)(const zxStr&),
                    const zxStr& directory, const char* extension) {
  zxStr name;
  for (int i = 0; i < k_name_tries; ++i) {
    name = uniqfile(directory, extension);
    if ((file.*create)(name)) return name;
    if (zxplat::last_error() != zxplat::k_err_exists_on_create) break;
  }
  bail_code(1004, name);
  return name;
}

// Copies `from` into a new file beside `to`, down to the device, and for its
// owner alone: it must never be more readable than its source.  The name of
// the copy; empty if a failure was dropped on the way.
zxStr copy_beside(const zxStr& from, const zxStr& to) {
  zxBFile in;
  in.open_or_die(from);
  if (!in.is_open()) return {};
  zxBFile out;
  const zxStr name =
      create_unique(out, &zxBFile::try_create_private, dir_part(to), "cpy");
  if (!out.is_open()) return {};
  copy_rest(in, out);
  out.sync(no_detail);
  const bool all_read = !in.handle->error();
  in.close(no_detail);
  if (out.close()) return all_read ? name : zxStr();
  bail_code(1010, name);
  return {};
}

bool crosses_devices(zxplat::RenameResult result) {
  return result == zxplat::RenameResult::other_device ||
         (result == zxplat::RenameResult::failed &&
          zxplat::last_error() == zxplat::k_err_not_found);
}

// Deletes a copy that cannot take its place; the failure shows its own cause.
bool give_copy_up(const zxStr& copy, std::int32_t message, const zxStr& to) {
  const int reason = zxplat::last_error();
  zxplat::files.remove(copy.view());
  zxplat::set_last_error(reason);
  bail_code(message, to);
  return false;
}

// The whole of cpfile(); true if the copy stands under its name.
bool copy_file(const zxStr& from, const zxStr& to) {
  const zxStr copy = copy_beside(from, to);
  if (copy.is_empty()) return false;
  zxplat::copy_attributes(from.view(), copy.view());
  if (!try_delete(to)) return give_copy_up(copy, 1027, to);
  const bool renamed = zxplat::files.rename(copy.view(), to.view()) ==
                       zxplat::RenameResult::done;
  return renamed || give_copy_up(copy, 1038, to);
}

// The source goes only when the copy stands under the name `to`.
void move_by_copy(const zxStr& from, const zxStr& to) {
  if (copy_file(from, to)) delfile(from);
}

}  // namespace

zxStr with_slash(const zxStr& directory) {
  const std::int32_t n = directory.length();
  if (n == 0) return directory;
  const char last = directory.c_str()[n - 1];
  if (last == '\\' || (n == 2 && is_drive(directory))) return directory;
  if (last != '/') return directory + '\\';
  zxStr result = directory;
  result.at(n - 1) = '\\';
  return result;
}

zxStr dir_part(const zxStr& path) { return {path.c_str(), dir_length(path)}; }

zxStr file_part(const zxStr& path) {
  const std::int32_t start = dir_length(path);
  return {path.c_str() + start, path.length() - start};
}

zxStr working_directory() {
  return with_slash(text_of(zxplat::current_directory, 398));
}

const zxStr& temp_path() {
  if (state.temp_directory.is_empty())
    state.temp_directory = with_slash(text_of(zxplat::temp_directory, 575));
  return state.temp_directory;
}

void clear_temp_path() { state.temp_directory.clear(); }

zxStr uniqfile(const zxStr& directory, const char* extension) {
  zxStr name;
  for (int i = 0; i < k_name_tries; ++i) {
    name = candidate_name(directory, extension);
    if (is_free(name)) return name;
  }
  bail_code(1037, name);
  return name;
}

zxStr unique_temp_name(const char* extension) {
  return uniqfile(temp_path(), extension);
}

zxStr create_temp_file(zxBFile& file, const char* extension) {
  return create_unique(file, &zxBFile::try_create_new, temp_path(), extension);
}

bool try_delete(const zxStr& name) {
  return zxplat::files.remove(name.view()) ||
         zxplat::last_error() == zxplat::k_err_not_found;
}

void delefile(const zxStr& name) {
  if (!try_delete(name)) bail_code(1027, name);
}

void delfile(const zxStr& name) {
  if (!zxplat::files.remove(name.view())) bail_code(1026, name);
}

void cpfile(const zxStr& from, const zxStr& to) { copy_file(from, to); }

void move_file(const zxStr& from, const zxStr& to) {
  const bool same = from == to || zxplat::same_file(from.view(), to.view());
  if (!ZX_ASSERT_AT(!same, "zxsys2", 287)) return;
  const bool onto_folder =
      zxplat::kind_of(to.view()) == zxplat::NameKind::directory;
  if (!ZX_ASSERT_AT(!onto_folder, "zxsys2", 288)) return;
  if (!zxplat::name_taken(from.view())) return bail_code(1002, from);

  // An old target must outlive a copy that may fail half way.
  if (!zxplat::on_one_device(from.view(), to.view()))
    return move_by_copy(from, to);

  if (!try_delete(to)) return bail_code(1027, to);
  const zxplat::RenameResult result =
      zxplat::files.rename(from.view(), to.view());
  if (result == zxplat::RenameResult::done) return;
  if (crosses_devices(result)) return move_by_copy(from, to);
  bail_code(1036, from + " to " + to);
}
