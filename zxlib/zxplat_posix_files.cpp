// zxplat_posix_files.cpp - the calls on files and the questions about names,
// for POSIX systems.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <fcntl.h>
#include <stdio.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>

#include "zxplat_posix_impl.h"

namespace zxplat {
namespace {

using posix::fail;
using posix::fail_on;
using posix::fail_with;
using posix::find;
using posix::folder_of;
using posix::is_absent;
using posix::last_component;
using posix::on_existing;
using posix::Path;
using posix::retry;
using posix::to_path;

using Status = struct stat;

constexpr int k_always = O_CLOEXEC | O_NOCTTY;
constexpr mode_t k_for_all = 0666;
constexpr mode_t k_for_owner = 0600;
constexpr mode_t k_permissions = 0777;
constexpr mode_t k_any_write = 0222;

// A transfer that no system refuses for its size.
constexpr std::size_t k_most_bytes = std::size_t{1} << 30;

// -- opening; these leave their failures in errno --

int open_path(const char* path, int flags, mode_t mode = 0) {
  return retry([&] { return ::open(path, flags | k_always, mode); });
}

int give_up(int fd, int error) {
  ::close(fd);
  errno = error;
  return k_no_fd;
}

bool is_read_only(const Status& status) {
  return S_ISREG(status.st_mode) && (status.st_mode & k_any_write) == 0;
}

// Refuses what the system lets through: a folder; for writing a file that
// nobody may write to, which does not stop the super-user; for both a pipe,
// whose reader would wait for itself.
int checked(int fd, int flags) {
  Status status;
  if (fd == k_no_fd) return fd;
  if (::fstat(fd, &status) != 0) return give_up(fd, errno);
  if (S_ISDIR(status.st_mode)) return give_up(fd, EISDIR);
  const int access = flags & O_ACCMODE;
  if (access == O_RDWR && S_ISFIFO(status.st_mode)) return give_up(fd, EACCES);
  if (access != O_RDONLY && is_read_only(status)) return give_up(fd, EACCES);
  // From here on a reader waits for its writer; if there is none yet, it is at
  // the end.
  if (::fcntl(fd, F_SETFL, flags & O_APPEND) != 0) return give_up(fd, errno);
  return fd;
}

// A pipe without another end must not hold the process up.
int open_existing(Path& path, int flags) {
  const int fd = on_existing(path, [&](const char* text) {
    return open_path(text, flags | O_NONBLOCK);
  });
  return checked(fd, flags);
}

// Opens the file for writing, or makes it if it is in its folder in no
// spelling, or if it is a link that leads nowhere.
int open_or_make(Path& path, int flags) {
  const int fd = open_existing(path, flags);
  if (fd != k_no_fd || !is_absent(errno)) return fd;
  return open_path(path.text, flags | O_CREAT, k_for_all);
}

// Only a regular file has a size to cut, and it is cut behind the checks.
int cut(int fd) {
  Status status;
  if (fd == k_no_fd) return fd;
  if (::fstat(fd, &status) != 0) return give_up(fd, errno);
  if (!S_ISREG(status.st_mode)) return fd;
  if (retry([&] { return ::ftruncate(fd, 0); }) != 0) return give_up(fd, errno);
  return fd;
}

// What cannot be positioned, such as a pipe, is at its end anyway.
int at_end(int fd) {
  if (fd != k_no_fd) ::lseek(fd, 0, SEEK_END);
  return fd;
}

int make_new(Path& path, mode_t mode) {
  const int error = find(path);
  if (!is_absent(error)) {
    errno = error == 0 ? EEXIST : error;
    return k_no_fd;
  }
  return open_path(path.text, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW, mode);
}

int open_as(Path& path, OpenMode mode) {
  switch (mode) {
    case OpenMode::read:
      return open_existing(path, O_RDONLY);
    case OpenMode::create:
      return cut(open_or_make(path, O_WRONLY));
    case OpenMode::create_new:
      return make_new(path, k_for_all);
    case OpenMode::create_private:
      return make_new(path, k_for_owner);
    case OpenMode::read_write:
      return open_existing(path, O_RDWR);
    case OpenMode::append:
      return at_end(open_or_make(path, O_WRONLY | O_APPEND));
    case OpenMode::read_append:
      return at_end(open_or_make(path, O_RDWR | O_APPEND));
  }
  errno = EINVAL;
  return k_no_fd;
}

Fd open_null_device(OpenMode mode) {
  const bool both =
      mode == OpenMode::read_write || mode == OpenMode::read_append;
  const int flags = mode == OpenMode::read ? O_RDONLY
                    : both                 ? O_RDWR
                                           : O_WRONLY;
  const Fd fd = open_path("/dev/null", flags);
  if (fd == k_no_fd) fail();
  return fd;
}

Fd open_file(std::string_view name, OpenMode mode) {
  if (is_null_device(name)) return open_null_device(mode);
  Path path;
  if (!to_path(name, path)) return k_no_fd;
  const Fd fd = open_as(path, mode);
  if (fd == k_no_fd) fail_on(path, k_err_exists_on_create);
  return fd;
}

// -- the calls on descriptors --

// The result of a call as the table hands it out: -1 with its number set.
std::int64_t counted(std::int64_t result) {
  if (result == -1) fail();
  return result;
}

std::int64_t read_bytes(Fd fd, void* buffer, std::size_t size) {
  size = std::min(size, k_most_bytes);
  return counted(retry([&] { return ::read(fd, buffer, size); }));
}

std::int64_t write_bytes(Fd fd, const void* buffer, std::size_t size) {
  size = std::min(size, k_most_bytes);
  return counted(retry([&] { return ::write(fd, buffer, size); }));
}

std::int64_t seek_to(Fd fd, std::int64_t offset, Whence whence) {
  const int from = whence == Whence::start     ? SEEK_SET
                   : whence == Whence::current ? SEEK_CUR
                                               : SEEK_END;
  return counted(::lseek(fd, offset, from));
}

// EINVAL says that there is no device to force anything down to, as behind
// a pipe or a terminal.
bool flush_file(Fd fd) {
  const int result = retry([&] { return ::fsync(fd); });
  return result == 0 || errno == EINVAL || fail();
}

// What has no size, such as a pipe, gives 0.
std::int64_t size_of(Fd fd) {
  Status status;
  if (::fstat(fd, &status) != 0) return counted(-1);
  return status.st_size;
}

// What the system says of a descriptor that was opened for reading differs
// from call to call.
bool check_writable(Fd fd) {
  const int flags = ::fcntl(fd, F_GETFL);
  if (flags == -1) return fail();
  return (flags & O_ACCMODE) != O_RDONLY || fail_with(k_err_denied);
}

bool set_file_size(Fd fd, std::int64_t size) {
  if (!check_writable(fd)) return false;
  return retry([&] { return ::ftruncate(fd, size); }) == 0 || fail();
}

// -- locks --

// Of the locks that the system has, these alone belong to the open file: two
// descriptors of one process exclude each other, and closing one of them
// leaves the locks of the other alone.
bool change_lock(Fd fd, short type, std::int64_t start, std::int64_t size) {
  struct flock range = {};
  range.l_type = type;
  range.l_whence = SEEK_SET;
  range.l_start = start;
  range.l_len = size;
  if (::fcntl(fd, F_OFD_SETLK, &range) == 0) return true;
  const bool is_held = errno == EAGAIN || errno == EACCES;
  return is_held ? fail_with(k_err_lock) : fail();
}

bool lock_range(Fd fd, std::int64_t start, std::int64_t size) {
  return check_writable(fd) && change_lock(fd, F_WRLCK, start, size);
}

bool unlock_range(Fd fd, std::int64_t start, std::int64_t size) {
  return check_writable(fd) && change_lock(fd, F_UNLCK, start, size);
}

// There is but one kind of stream here.
bool set_stream_mode(Fd fd, StreamMode) { return set_binary(fd); }

// Not repeated after a signal: the descriptor is gone by then, and its
// number may be another file's.
bool close_file(Fd fd) { return ::close(fd) == 0 || fail(); }

// -- renaming and deleting --

bool status_of_entry(Path& path, Status& status) {
  return on_existing(path, [&](const char* text) {
           return ::lstat(text, &status);
         }) == 0;
}

bool is_one_file(const Status& a, const Status& b) {
  return a.st_dev == b.st_dev && a.st_ino == b.st_ino;
}

std::string_view last_name(const Path& path) {
  const std::string_view text(path.text, path.length);
  const std::size_t begin = last_component(path);
  return text.substr(begin, text.find('/', begin) - begin);
}

bool folder_status(const Path& path, Status& status) {
  Path folder;
  folder_of(path, folder);
  return ::stat(folder.text, &status) == 0;
}

// True if both paths, as found, name one entry of one folder.
bool is_same_entry(const Path& a, const Path& b) {
  Status folder_a;
  Status folder_b;
  return last_name(a) == last_name(b) && folder_status(a, folder_a) &&
         folder_status(b, folder_b) && is_one_file(folder_a, folder_b);
}

// For file systems that know no rename without replacing: a second name
// first, which the system refuses if it is taken.  Where there are no second
// names either, the plain rename is left: the name was free just before.
int link_then_unlink(const char* from, const char* to) {
  if (::link(from, to) != 0) {
    const bool no_links =
        errno == EPERM || errno == EOPNOTSUPP || errno == ENOSYS;
    return no_links ? ::rename(from, to) : -1;
  }
  if (::unlink(from) == 0) return 0;
  const int error = errno;
  ::unlink(to);
  errno = error;
  return -1;
}

int rename_without_replacing(const char* from, const char* to) {
  if (::renameat2(AT_FDCWD, from, AT_FDCWD, to, RENAME_NOREPLACE) == 0) {
    return 0;
  }
  if (errno != EINVAL && errno != ENOSYS) return -1;
  return link_then_unlink(from, to);
}

// Settles what the new name is to be, given how it is found on the disk: a
// name that is free keeps its spelling in a folder as found, and so does the
// old file's own name in other letters.  0, or errno.
int settle_target(const Path& source, Path& target) {
  const Path spelled = target;
  const int error = find(target);
  if (error != 0) return is_absent(error) ? 0 : error;
  if (!is_same_entry(source, target)) return EEXIST;
  const std::size_t at = last_component(target);
  std::memcpy(target.text + at, spelled.text + at, target.length - at);
  return 0;
}

RenameResult rename_path(const Path& source, Path& target) {
  errno = settle_target(source, target);
  if (errno == 0) {
    // A file that has the name already is done with.
    if (is_same_entry(source, target)) return RenameResult::done;
    if (rename_without_replacing(source.text, target.text) == 0) {
      return RenameResult::done;
    }
  }
  const bool crosses = errno == EXDEV;
  fail_on(target);
  return crosses ? RenameResult::other_device : RenameResult::failed;
}

RenameResult rename_file(std::string_view from, std::string_view to) {
  Path source;
  Path target;
  Status status;
  if (!to_path(from, source)) return RenameResult::failed;
  if (!status_of_entry(source, status)) {
    fail_on(source);
    return RenameResult::failed;
  }
  if (is_null_device(to)) {
    fail_with(k_err_exists);
    return RenameResult::failed;
  }
  if (!to_path(to, target)) return RenameResult::failed;
  return rename_path(source, target);
}

bool is_device(const Status& status) {
  return S_ISCHR(status.st_mode) || S_ISBLK(status.st_mode);
}

// A link is deleted itself, whatever it leads to.
bool remove_file(std::string_view name) {
  Path path;
  Status status;
  if (!to_path(name, path)) return false;
  if (!status_of_entry(path, status)) return fail_on(path);
  if (S_ISDIR(status.st_mode) || is_device(status))
    return fail_with(k_err_denied);
  if (is_read_only(status)) return fail_with(k_err_denied);
  return ::unlink(path.text) == 0 || fail_on(path);
}

// -- questions about names --

bool status_of_file(std::string_view name, Path& path, Status& status) {
  if (!to_path(name, path)) return false;
  const auto call = [&](const char* text) { return ::stat(text, &status); };
  return on_existing(path, call) == 0 || fail_on(path);
}

// The mount that a path lies on: one device can be mounted twice, and no
// rename crosses from one mount to the other.  False if it cannot be told.
bool mount_of(const char* path, std::uint64_t& mount) {
  struct statx status;
  const int flags = AT_SYMLINK_NOFOLLOW;
  if (::statx(AT_FDCWD, path, flags, STATX_MNT_ID, &status) != 0 ||
      (status.stx_mask & STATX_MNT_ID) == 0)
    return false;
  mount = status.stx_mnt_id;
  return true;
}

bool mounts_differ(const char* a, const char* b) {
  std::uint64_t mount_a = 0;
  std::uint64_t mount_b = 0;
  return mount_of(a, mount_a) && mount_of(b, mount_b) && mount_a != mount_b;
}

// True if both devices are known and differ.
bool crosses_devices(std::string_view from, std::string_view to) {
  Path source;
  Path target;
  Status file;
  Status folder;
  if (!to_path(from, source) || !to_path(to, target)) return false;
  if (!status_of_entry(source, file)) return false;
  find(target);  // for its folder, which may be spelled otherwise
  if (!folder_status(target, folder)) return false;
  Path folder_path;
  folder_of(target, folder_path);
  return file.st_dev != folder.st_dev ||
         mounts_differ(source.text, folder_path.text);
}

// Has a call carried out on the path of `to`, with the status of `from`.
template <typename Call>
bool copy_from(std::string_view from, std::string_view to, const Call& call) {
  Path path;
  Status source;
  Status target;
  if (!status_of_file(from, path, source)) return false;
  if (!status_of_file(to, path, target)) return false;
  return call(static_cast<const char*>(path.text), source) == 0 ||
         fail_on(path);
}

NameKind kind_of_mode(mode_t mode) {
  if (S_ISREG(mode)) return NameKind::file;
  if (S_ISDIR(mode)) return NameKind::directory;
  return S_ISCHR(mode) ? NameKind::device : NameKind::other;
}

bool bind_to(Fd from, Fd to) {
  return retry([&] { return ::dup2(from, to); }) != -1 || fail();
}

constexpr FileCalls k_calls = {
    open_file,       read_bytes,         write_bytes,
    seek_to,         flush_file,         size_of,
    set_file_size,   lock_range,         unlock_range,
    set_stream_mode, close_file,         rename_file,
    remove_file,     posix::make_folder, posix::remove_folder,
    bind_to,         posix::disk_space,
};

}  // namespace

const FileCalls system_files = k_calls;
constinit FileCalls files = k_calls;

bool has_stream(Fd fd) {
  Status status;
  return ::fstat(fd, &status) == 0 && status.st_mode != 0;
}

NameKind kind_of(std::string_view name) { return status_of(name).kind; }

FileStatus status_of(std::string_view name) {
  Path path;
  Status status;
  if (!status_of_file(name, path, status))
    return {NameKind::missing, 0, 0, false};
  const NameKind kind = kind_of_mode(status.st_mode);
  return {kind, kind == NameKind::file ? status.st_size : 0,
          status.st_mtim.tv_sec, (status.st_mode & S_IXUSR) != 0};
}

bool name_taken(std::string_view name) {
  Path path;
  Status status;
  if (is_null_device(name)) return true;
  if (!to_path(name, path)) return false;
  return status_of_entry(path, status) || fail_on(path);
}

bool same_file(std::string_view a, std::string_view b) {
  Path path;
  Status status_a;
  Status status_b;
  return status_of_file(a, path, status_a) &&
         status_of_file(b, path, status_b) && is_one_file(status_a, status_b);
}

bool on_one_device(std::string_view from, std::string_view to) {
  const int number = last_error();
  const bool crosses = crosses_devices(from, to);
  set_last_error(number);  // nothing that this call meets is its failure
  return !crosses;
}

bool make_writable(std::string_view name) {
  Path path;
  Status status;
  if (!status_of_file(name, path, status)) return false;
  const mode_t mode = (status.st_mode & k_permissions) | S_IWUSR;
  return ::chmod(path.text, mode) == 0 || fail_on(path);
}

bool copy_permissions(std::string_view from, std::string_view to) {
  return copy_from(from, to, [](const char* path, const Status& source) {
    return ::chmod(path, source.st_mode & k_permissions);
  });
}

bool copy_time(std::string_view from, std::string_view to) {
  return copy_from(from, to, [](const char* path, const Status& source) {
    const timespec times[2] = {source.st_mtim, source.st_mtim};
    return ::utimensat(AT_FDCWD, path, times, 0);
  });
}

}  // namespace zxplat
