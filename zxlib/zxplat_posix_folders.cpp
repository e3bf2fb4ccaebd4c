// zxplat_posix_folders.cpp - folders, their entries and the disk, for POSIX
// systems.
// Tested by tests/zxlib/zxplat_folders_test.cpp.

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include "zxplat_impl.h"
#include "zxplat_posix_impl.h"

namespace zxplat {
namespace {

using common::is_dots;
using posix::fail;
using posix::fail_on;
using posix::fail_with;
using posix::find;
using posix::is_absent;
using posix::is_printer;
using posix::on_existing;
using posix::Path;
using posix::retry;
using posix::to_path;

// Disks are told about in the sectors that callers count in.
constexpr std::uint64_t k_sector = 512;

constexpr mode_t k_for_all = 0777;

// -- entries --

int open_folder(std::string_view name) {
  Path path;
  if (!to_path(name.empty() ? "." : name, path)) return k_no_fd;
  constexpr int k_flags = O_RDONLY | O_DIRECTORY | O_CLOEXEC;
  const int fd = on_existing(path, [](const char* text) {
    return retry([&] { return ::open(text, k_flags); });
  });
  if (fd == k_no_fd) fail_on(path);
  return fd;
}

// True if the name, put behind a folder, names the entry and nothing else.
bool is_usable(std::string_view name) {
  return name.find_first_of("\\*?:\"<>|") == name.npos &&
         !is_null_device(name) && !is_printer(name);
}

mode_t mode_of(int folder, const char* name, int flags) {
  struct stat status;
  return ::fstatat(folder, name, &status, flags) == 0 ? status.st_mode : 0;
}

// Not every file system tells in the entry what it is.
FolderEntry entry_of(int folder, const dirent64& entry) {
  const bool is_known = entry.d_type != DT_UNKNOWN;
  const bool is_link =
      is_known ? entry.d_type == DT_LNK
               : S_ISLNK(mode_of(folder, entry.d_name, AT_SYMLINK_NOFOLLOW));
  const bool is_folder = is_known && !is_link
                             ? entry.d_type == DT_DIR
                             : S_ISDIR(mode_of(folder, entry.d_name, 0));
  return {entry.d_name, is_folder, is_link};
}

}  // namespace

namespace posix {

// A folder of this name in other letters counts as taken.
bool make_folder(std::string_view name) {
  Path path;
  if (!to_path(name, path)) return false;
  const int error = find(path);
  if (error == 0 || !is_absent(error)) {
    errno = error == 0 ? EEXIST : error;
    return fail_on(path);
  }
  return ::mkdir(path.text, k_for_all) == 0 || fail_on(path);
}

bool remove_folder(std::string_view name) {
  Path path;
  if (!to_path(name, path)) return false;
  return on_existing(path, ::rmdir) == 0 || fail_on(path);
}

bool disk_space(char letter, DiskSpace& space) {
  const char drive[] = {letter, ':'};
  if (letter != '\0' && !is_drive_form({drive, sizeof drive}))
    return fail_with(k_err_path_not_found);
  struct statvfs status;
  if (retry([&] { return ::statvfs(".", &status); }) != 0) return fail();
  space.free_clusters = status.f_bavail;
  space.sectors_per_cluster = status.f_frsize / k_sector;
  space.bytes_per_sector = k_sector;
  return true;
}

}  // namespace posix

bool is_volume(std::string_view name) { return posix::is_drive_form(name); }

FolderReader::FolderReader(std::string_view folder)
    : handle(open_folder(folder)) {}

FolderReader::~FolderReader() {
  if (handle != k_no_fd) ::close(static_cast<int>(handle));
}

// The entries are taken from the system directly, since the C library's
// folder streams allocate.
bool FolderReader::next(FolderEntry& entry) {
  const int fd = static_cast<int>(handle);
  if (fd == k_no_fd) return false;
  for (;;) {
    if (at == size) {
      const ssize_t got = ::getdents64(fd, room, sizeof room);
      if (got < 0) fail();
      if (got <= 0) return false;
      at = 0;
      size = static_cast<std::size_t>(got);
    }
    const auto* raw = reinterpret_cast<const dirent64*>(room + at);
    at += raw->d_reclen;
    if (is_dots(raw->d_name) || !is_usable(raw->d_name)) continue;
    entry = entry_of(fd, *raw);
    return true;
  }
}

}  // namespace zxplat
