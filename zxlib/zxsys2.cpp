// zxsys2.cpp - copying, moving, deleting, folders, disks, the environment.
// Tests: tests/zxlib/zxsys2_test.cpp.
#include "zxsys2.h"

#include <algorithm>
#include <cstdlib>

#include "zxisfile.h"
#include "zxplat.h"

namespace {

constinit zxStr temp_dir;

// What a directory must have free to count as one with space.
constexpr std::int32_t k_least_space = 512000;

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

// ---- copying and moving

// As create_unique(), fatal on failure.
zxStr create_unique_or_die(zxBFile& file, zxCreateNew create,
                           const zxStr& directory, const char* extension) {
  zxStr name;
  switch (create_unique(file, create, directory, extension, name)) {
    case zxUnique::created:
      break;
    case zxUnique::no_name:
      bail_code(1037, name);
      break;
    case zxUnique::not_created:
      bail_code(1004, name);
      break;
  }
  return name;
}

// Whether a copy has to be on the device before its source may go.
enum class Safety { source_stays, source_goes };

// Copies `from` into a new file beside `to`, for its owner alone: it must
// never be more readable than its source.  The name of the copy; empty if a
// failure was dropped on the way.
zxStr copy_beside(const zxStr& from, const zxStr& to, Safety safety) {
  zxBFile in;
  in.open_or_die(from == "-" ? zxStr(".\\-") : from);  // the file, no stream
  if (!in.is_open()) return {};
  zxBFile out;
  const zxStr name = create_unique_or_die(out, &zxBFile::try_create_private,
                                          dir_part(to), "cpy");
  if (!out.is_open()) return {};
  copy_stream(in, out);
  if (safety == Safety::source_goes) out.sync(no_detail);
  const bool all_read = !in.handle->error();
  in.close(no_detail);
  if (out.close()) return all_read ? name : zxStr();
  bail_code(1010, name);
  return {};
}

// Deletes a copy that cannot take its place; the failure shows its own cause.
// Where the file that was deleted to make place was the source itself, the
// copy is all that there is of it, and stays.
bool give_copy_up(const zxStr& from, const zxStr& copy, std::int32_t message,
                  const zxStr& to) {
  const int reason = zxplat::last_error();
  if (zxplat::kind_of(from.view()) != zxplat::NameKind::missing) {
    zxplat::make_writable(copy.view());
    zxplat::files.remove(copy.view());
  }
  zxplat::set_last_error(reason);
  bail_code(message, to);
  return false;
}

// The whole of cpfile(); true if the copy stands under its name.
bool copy_file(const zxStr& from, const zxStr& to, Safety safety) {
  const zxStr copy = copy_beside(from, to, safety);
  if (copy.is_empty()) return false;
  copy_time(from, copy);
  zxplat::copy_permissions(from.view(), copy.view());
  if (!try_delete(to)) return give_copy_up(from, copy, 1027, to);
  const bool renamed = zxplat::files.rename(copy.view(), to.view()) ==
                       zxplat::RenameResult::done;
  return renamed || give_copy_up(from, copy, 1038, to);
}

bool crosses_devices(zxplat::RenameResult result) {
  return result == zxplat::RenameResult::other_device ||
         (result == zxplat::RenameResult::failed &&
          zxplat::last_error() == zxplat::k_err_not_found);
}

// The source goes only when the copy stands under the name `to`.
void move_by_copy(const zxStr& from, const zxStr& to) {
  if (copy_file(from, to, Safety::source_goes)) delfile(from);
}

// Carries an operation out for each file of a walk, the target being the
// same name in another directory.
void each_to_dir(const zxStr& pattern, const zxStr& dir, std::int32_t message,
                 void (*operation)(const zxStr&, const zxStr&)) {
  if (!isfile(with_slash(dir), "d")) return bail_code(message, dir);
  zxQVA<zxStr> list;
  list.append(pattern);
  for (zxStr name; next_file(list, name);)
    operation(name, path_join(dir, file_part(name)));
}

// ---- folders

bool ends_in_separator(const zxStr& path) {
  return path.view().ends_with('\\') || path.view().ends_with('/');
}

// The name without separators at its end, as far as it is no root.
zxStr without_final_separators(zxStr path) {
  const std::int32_t shortest = path_has_drive(path.view()) ? 3 : 1;
  while (path.length() > shortest && ends_in_separator(path))
    path.set_length(path.length() - 1);
  return path;
}

}  // namespace

// ---- copying and moving

void cpfile(const zxStr& from, const zxStr& to) {
  copy_file(from, to, Safety::source_stays);
}

void move_file(const zxStr& from, const zxStr& to) {
  const bool same = from == to || zxplat::same_file(from.view(), to.view());
  if (!ZX_ASSERT_AT(!same, "zxsys2", 287)) return;
  const bool onto_folder =
      zxplat::kind_of(to.view()) == zxplat::NameKind::directory;
  if (!ZX_ASSERT_AT(!onto_folder, "zxsys2", 288)) return;
  if (zxplat::is_null_device(from.view()) || !zxplat::name_taken(from.view()))
    return bail_code(1002, from);

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

void cpfiles2dir(const zxStr& pattern, const zxStr& dir) {
  each_to_dir(pattern, dir, 1034, cpfile);
}

void mvfiles2dir(const zxStr& pattern, const zxStr& dir) {
  each_to_dir(pattern, dir, 1035, move_file);
}

void copy_time(const zxStr& from, const zxStr& to) {
  const bool is_known =
      zxplat::kind_of(from.view()) != zxplat::NameKind::missing;
  if (!ZX_ASSERT_AT(is_known, "zxsys2", 174)) return;
  ZX_ASSERT_AT(zxplat::copy_time(from.view(), to.view()), "zxsys2", 177);
}

// ---- deleting

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

void delfiles(const zxStr& pattern) {
  zxQVA<zxStr> list;
  list.append(pattern);
  for (zxStr name; next_file(list, name);) delefile(name);
}

// ---- directories

bool try_createdir(const zxStr& name) {
  const zxStr folder = without_final_separators(name);
  return zxplat::files.make_folder(folder.view());
}

void createdir(const zxStr& name) {
  if (!try_createdir(name)) bail_code(1030, name);
}

bool make_path(const zxStr& name) {
  if (name.is_empty() || zx_size(name.length()) > zxplat::k_max_name)
    return false;
  zxQVA<zxStr> missing;  // the innermost first
  zxStr path = without_final_separators(name);
  while (!isfile(path, "d")) {
    if (ends_in_separator(path)) return false;  // a root that is not there
    missing.append(path);
    const zxStr above = zxPath(path).dir;
    if (above.is_empty()) return false;
    path = without_final_separators(above);
    if (path.length() >= missing.last().length()) return false;
  }
  while (missing.length() > 0) {
    const zxStr next = missing.pop_last();
    // Another process may have been faster.
    if (!try_createdir(next) && !isfile(next, "d")) return false;
  }
  return true;
}

void make_path_or_die(const zxStr& name) {
  if (!make_path(name)) bail_code(1032, name);
}

void deldir(const zxStr& name) {
  if (!zxplat::files.remove_folder(name.view())) bail_code(1031, name);
}

zxStr get_cwd() { return text_of(zxplat::current_directory, 398); }

zxStr chg_dir(const zxStr& name) {
  const zxStr old = get_cwd();
  if (name.is_empty()) return old;
  const zxPath path(name, true);
  if (!zxplat::set_current_directory(path.dir.view())) bail_code(1032, name);
  return old;
}

// ---- disks

std::int32_t diskfree(char drive_letter, std::uint32_t unit) {
  if (!ZX_ASSERT(unit > 0)) return 0;
  zxplat::DiskSpace space;
  if (!zxplat::files.disk_space(drive_letter, space)) {
    bail_code(1028);
    return 0;
  }
  const std::uint64_t sectors = space.free_clusters * space.sectors_per_cluster;
  const std::uint64_t units = sectors / unit * space.bytes_per_sector;
  return static_cast<std::int32_t>(std::min<std::uint64_t>(units, INT32_MAX));
}

std::int32_t disk_bytes(char drive_letter) { return diskfree(drive_letter, 1); }

std::int32_t disk_kb(char drive_letter) { return diskfree(drive_letter, 1024); }

bool drive_ok(char drive_letter) {
  if (!ZX_ASSERT_AT(zx_is(drive_letter, k_class_latin), "zxsys2", 519))
    return false;
  zxplat::DiskSpace space;
  return zxplat::files.disk_space(drive_letter, space);
}

bool space_for(const zxStr& path) {
  const char letter = zxPath(path, true).drive_letter;
  if (letter != '\0' && !drive_ok(letter)) return false;
  return disk_bytes(letter) >= k_least_space && isfile(path, "dw");
}

// ---- temporary files, the environment

const zxStr& temp_path() {
  if (temp_dir.is_empty())
    temp_dir = with_slash(text_of(zxplat::temp_directory, 575));
  return temp_dir;
}

void clear_temp_path() { temp_dir.clear(); }

zxStr uniqfile(const zxStr& directory, const char* extension) {
  zxStr name;
  if (!try_uniqfile(directory, extension, name)) bail_code(1037, name);
  return name;
}

zxStr unique_temp_name(const char* extension) {
  return uniqfile(temp_path(), extension);
}

zxStr create_temp_file(zxBFile& file, const char* extension) {
  return create_unique_or_die(file, &zxBFile::try_create_new, temp_path(),
                              extension);
}

zxStr get_env(const zxStr& name) {
  const char* value = std::getenv(name.c_str());
  return value != nullptr ? zxStr(value) : zxStr();
}

void redirect_stdout(const zxStr& name) {
  constexpr zxplat::Fd k_out = zxplat::k_stdout_fd;
  zx_standard_stream(k_out).flush();  // what was written goes where it was to
  const zxplat::Fd fd =
      zxplat::files.open(name.view(), zxplat::OpenMode::read_append);
  if (!ZX_ASSERT_AT(fd != zxplat::k_no_fd, "zxsys2", 630)) return;
  ZX_ASSERT_AT(zxplat::files.bind(fd, k_out), "zxsys2", 631);
  ZX_ASSERT_AT(zxplat::files.close(fd), "zxsys2", 632);
}
