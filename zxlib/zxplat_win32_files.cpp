// zxplat_win32_files.cpp - the calls on files and the questions about names,
// for Windows.
//
// Descriptors are the C runtime's, so that 0 to 2 are the standard streams.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <fcntl.h>
#include <io.h>
#include <share.h>
#include <sys/stat.h>
#include <windows.h>

#include <algorithm>

#include "zxplat_win32_impl.h"

namespace zxplat {
namespace {

using win32::Attempt;
using win32::fail_with;
using win32::Name;
using win32::to_name;

// A transfer that the runtime's types can count.
constexpr std::size_t k_most_bytes = std::size_t{1} << 30;

constexpr DWORD k_share_all =
    FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;

// The attributes that a copy takes over; the others tell how a file is
// stored.
constexpr DWORD k_copied_attributes =
    FILE_ATTRIBUTE_READONLY | FILE_ATTRIBUTE_HIDDEN | FILE_ATTRIBUTE_SYSTEM |
    FILE_ATTRIBUTE_ARCHIVE;

// -- opening --

int open_flags(OpenMode mode) {
  switch (mode) {
    case OpenMode::read:
      return _O_RDONLY;
    case OpenMode::create:
      return _O_WRONLY | _O_CREAT | _O_TRUNC;
    case OpenMode::create_new:
    case OpenMode::create_private:
      return _O_WRONLY | _O_CREAT | _O_EXCL;
    case OpenMode::read_write:
      return _O_RDWR;
    case OpenMode::append:
      return _O_WRONLY | _O_CREAT | _O_APPEND;
    case OpenMode::read_append:
      return _O_RDWR | _O_CREAT | _O_APPEND;
  }
  return _O_RDONLY;
}

Fd open_path(const char* path, int flags) {
  return ::_sopen(path, flags | _O_BINARY | _O_NOINHERIT, _SH_DENYNO,
                  _S_IREAD | _S_IWRITE);
}

// Checked ahead of the system, which lets the super-user through where it is
// emulated.
bool is_read_only(const char* path) {
  const Attempt attempt;
  const DWORD attributes = ::GetFileAttributesA(path);
  attempt.restore();
  return attributes != INVALID_FILE_ATTRIBUTES &&
         (attributes & FILE_ATTRIBUTE_DIRECTORY) == 0 &&
         (attributes & FILE_ATTRIBUTE_READONLY) != 0;
}

bool is_appending(OpenMode mode) {
  return mode == OpenMode::append || mode == OpenMode::read_append;
}

bool is_overwriting(OpenMode mode) {
  return mode == OpenMode::create || mode == OpenMode::read_write ||
         is_appending(mode);
}

Fd open_null_device(OpenMode mode) {
  const Attempt attempt;
  constexpr int k_making = _O_CREAT | _O_EXCL | _O_TRUNC;
  const Fd fd = open_path("NUL", open_flags(mode) & ~k_making);
  return attempt.settle(fd, fd != k_no_fd);
}

// What cannot be positioned, such as a pipe, is at its end anyway.
void go_to_end(Fd fd) { ::_lseeki64(fd, 0, SEEK_END); }

Fd open_file(std::string_view name, OpenMode mode) {
  Name text;
  if (is_null_device(name)) return open_null_device(mode);
  if (!to_name(name, text)) return k_no_fd;
  if (is_overwriting(mode) && is_read_only(text.text)) {
    fail_with(k_err_denied);
    return k_no_fd;
  }
  const Attempt attempt;
  const Fd fd = open_path(text.text, open_flags(mode));
  if (fd != k_no_fd && is_appending(mode)) go_to_end(fd);
  return attempt.settle(fd, fd != k_no_fd);
}

// -- the calls on descriptors --

std::int64_t read_bytes(Fd fd, void* buffer, std::size_t size) {
  const Attempt attempt;
  const std::size_t most = std::min(size, k_most_bytes);
  const int count = ::_read(fd, buffer, static_cast<unsigned>(most));
  // Some runtimes remember an end of file until the next seek; the file may
  // grow before it is read again.
  if (count == 0) ::_lseeki64(fd, 0, SEEK_CUR);
  return attempt.settle(std::int64_t{count}, count >= 0);
}

std::int64_t write_bytes(Fd fd, const void* buffer, std::size_t size) {
  const Attempt attempt;
  const std::size_t most = std::min(size, k_most_bytes);
  const int count = ::_write(fd, buffer, static_cast<unsigned>(most));
  return attempt.settle(std::int64_t{count}, count >= 0);
}

std::int64_t seek_to(Fd fd, std::int64_t offset, Whence whence) {
  const Attempt attempt;
  const int from = whence == Whence::start     ? SEEK_SET
                   : whence == Whence::current ? SEEK_CUR
                                               : SEEK_END;
  const std::int64_t position = ::_lseeki64(fd, offset, from);
  return attempt.settle(position, position >= 0);
}

HANDLE handle_of(Fd fd) {
  return reinterpret_cast<HANDLE>(::_get_osfhandle(fd));
}

bool is_on_disk(Fd fd) {
  return ::GetFileType(handle_of(fd)) == FILE_TYPE_DISK;
}

// Only a disk is waited for: behind a pipe the system would wait until the
// other side has read everything.
bool flush_file(Fd fd) {
  const Attempt attempt;
  if (::_get_osfhandle(fd) < 0) return attempt.settle(false);
  return attempt.settle(!is_on_disk(fd) || ::_commit(fd) == 0);
}

// What has no size, such as a pipe, gives 0.
std::int64_t size_of(Fd fd) {
  const Attempt attempt;
  if (::_get_osfhandle(fd) < 0) return attempt.settle(std::int64_t{-1}, false);
  const std::int64_t size = is_on_disk(fd) ? ::_filelengthi64(fd) : 0;
  return attempt.settle(size, size >= 0);
}

// Writing nothing asks for the right to write, whose lack some systems tell
// in other numbers when it comes to cutting.
bool may_write(HANDLE handle) {
  DWORD written;
  return ::WriteFile(handle, "", 0, &written, nullptr) != 0;
}

// The system cuts and widens at the position, which is put back.
bool cut_at(HANDLE handle, LARGE_INTEGER end) {
  LARGE_INTEGER position;
  if (!may_write(handle) ||
      !::SetFilePointerEx(handle, {}, &position, FILE_CURRENT) ||
      !::SetFilePointerEx(handle, end, nullptr, FILE_BEGIN))
    return false;
  const bool is_cut = ::SetEndOfFile(handle) != 0;
  const DWORD error = ::GetLastError();
  ::SetFilePointerEx(handle, position, nullptr, FILE_BEGIN);
  ::SetLastError(error);
  return is_cut;
}

bool set_file_size(Fd fd, std::int64_t size) {
  if (size < 0) return fail_with(k_err_bad_parameter);
  const Attempt attempt;
  LARGE_INTEGER end;
  end.QuadPart = size;
  return attempt.settle(::_get_osfhandle(fd) >= 0 &&
                        cut_at(handle_of(fd), end));
}

// -- locks --

DWORD low_half(std::int64_t number) { return static_cast<DWORD>(number); }
DWORD high_half(std::int64_t number) {
  return static_cast<DWORD>(number >> 32);
}

bool lock_range(Fd fd, std::int64_t start, std::int64_t size) {
  const Attempt attempt;
  return attempt.settle(::_get_osfhandle(fd) >= 0 &&
                        ::LockFile(handle_of(fd), low_half(start),
                                   high_half(start), low_half(size),
                                   high_half(size)));
}

bool unlock_range(Fd fd, std::int64_t start, std::int64_t size) {
  const Attempt attempt;
  return attempt.settle(::_get_osfhandle(fd) >= 0 &&
                        ::UnlockFile(handle_of(fd), low_half(start),
                                     high_half(start), low_half(size),
                                     high_half(size)));
}

bool set_stream_mode(Fd fd, StreamMode mode) {
  if (mode == StreamMode::binary) return set_binary(fd);
  const Attempt attempt;
  return attempt.settle(::_get_osfhandle(fd) >= 0 &&
                        ::_setmode(fd, _O_TEXT) != -1);
}

bool close_file(Fd fd) {
  const Attempt attempt;
  return attempt.settle(::_close(fd) == 0);
}

// -- renaming and deleting --

RenameResult renamed(bool is_done) {
  if (is_done) return RenameResult::done;
  return last_error() == k_err_other_device ? RenameResult::other_device
                                            : RenameResult::failed;
}

RenameResult rename_file(std::string_view from, std::string_view to) {
  Name source;
  Name target;
  if (!to_name(from, source)) return RenameResult::failed;
  if (is_null_device(to)) return renamed(fail_with(k_err_exists));
  if (!to_name(to, target)) return RenameResult::failed;
  const Attempt attempt;
  return renamed(
      attempt.settle(::MoveFileExA(source.text, target.text, 0) != 0));
}

bool remove_file(std::string_view name) {
  Name text;
  if (!to_name(name, text)) return false;
  const Attempt attempt;
  return attempt.settle(::DeleteFileA(text.text) != 0);
}

// -- questions about names --

using Information = BY_HANDLE_FILE_INFORMATION;

// A handle of the system, given back at the end of the block.
class Handle {
 public:
  // Opens a file or a folder; links are followed.
  Handle(const char* path, DWORD access)
      : handle(::CreateFileA(path, access, k_share_all, nullptr, OPEN_EXISTING,
                             FILE_FLAG_BACKUP_SEMANTICS, nullptr)) {}
  Handle(const Handle&) = delete;
  Handle& operator=(const Handle&) = delete;
  ~Handle() {
    if (handle != INVALID_HANDLE_VALUE) ::CloseHandle(handle);
  }

  bool is_open() const { return handle != INVALID_HANDLE_VALUE; }
  HANDLE get() const { return handle; }

 private:
  HANDLE handle;
};

bool information_of(const char* path, Information& information) {
  const Handle file(path, 0);
  return file.is_open() &&
         ::GetFileInformationByHandle(file.get(), &information);
}

bool is_one_file(const Information& a, const Information& b) {
  return a.dwVolumeSerialNumber == b.dwVolumeSerialNumber &&
         a.nFileIndexHigh == b.nFileIndexHigh &&
         a.nFileIndexLow == b.nFileIndexLow;
}

// Cuts a name down to the folder that holds its last component.
void cut_to_folder(Name& name) {
  const std::string_view text(name.text);
  const std::size_t end = text.find_last_not_of("\\/");
  if (end == text.npos) return;  // the root
  const std::size_t separator = text.find_last_of("\\/:", end);
  const std::size_t length = separator == text.npos ? 0 : separator + 1;
  name.text[length] = '\0';
  const bool is_bare = length == 0 || name.text[length - 1] == ':';
  if (is_bare && length < k_max_name) {
    name.text[length] = '.';
    name.text[length + 1] = '\0';
  }
}

bool crosses_devices(std::string_view from, std::string_view to) {
  Name source;
  Name target;
  Information file;
  Information folder;
  if (!to_name(from, source) || !to_name(to, target)) return false;
  cut_to_folder(target);
  return information_of(source.text, file) &&
         information_of(target.text, folder) &&
         file.dwVolumeSerialNumber != folder.dwVolumeSerialNumber;
}

// A file without any attribute is told so by a bit of its own.
DWORD attributes_to_set(const Information& information) {
  const DWORD kept = information.dwFileAttributes & k_copied_attributes;
  return kept != 0 ? kept : static_cast<DWORD>(FILE_ATTRIBUTE_NORMAL);
}

bool set_attributes(const char* path, const Information& source) {
  return ::SetFileAttributesA(path, attributes_to_set(source)) != 0;
}

bool set_times(const char* path, const Information& source) {
  const FILETIME& time = source.ftLastWriteTime;
  const Handle file(path, FILE_WRITE_ATTRIBUTES);
  return file.is_open() && ::SetFileTime(file.get(), nullptr, &time, &time);
}

// Has a call carried out on the path of `to`, with the information on `from`.
bool copy_from(std::string_view from, std::string_view to,
               bool (*call)(const char*, const Information&)) {
  Name source;
  Name target;
  Information information;
  if (!to_name(from, source) || !to_name(to, target)) return false;
  const Attempt attempt;
  return attempt.settle(information_of(source.text, information) &&
                        call(target.text, information));
}

// What an answer of the system on a file comes to; the two structures that
// it answers in have these fields alike.
template <typename Answer>
FileStatus status_from(const char* path, const Answer& answer) {
  const bool is_folder =
      (answer.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
  const auto high = static_cast<std::int64_t>(answer.nFileSizeHigh);
  struct __stat64 guess;
  const bool is_executable = is_folder || (::_stat64(path, &guess) == 0 &&
                                           (guess.st_mode & _S_IEXEC) != 0);
  return {is_folder ? NameKind::directory : NameKind::file,
          is_folder ? 0 : high << 32 | answer.nFileSizeLow,
          win32::seconds_since_1970(answer.ftLastWriteTime.dwHighDateTime,
                                    answer.ftLastWriteTime.dwLowDateTime),
          is_executable};
}

bool bind_to(Fd from, Fd to) {
  const Attempt attempt;
  return attempt.settle(::_dup2(from, to) == 0);
}

constexpr FileCalls k_calls = {
    open_file,       read_bytes,         write_bytes,
    seek_to,         flush_file,         size_of,
    set_file_size,   lock_range,         unlock_range,
    set_stream_mode, close_file,         rename_file,
    remove_file,     win32::make_folder, win32::remove_folder,
    bind_to,         win32::disk_space,
};

}  // namespace

const FileCalls system_files = k_calls;
constinit FileCalls files = k_calls;

bool has_stream(Fd fd) {
  const Attempt attempt;
  struct _stat64 status;
  const bool is_there = ::_get_osfhandle(fd) >= 0 &&
                        ::_fstat64(fd, &status) == 0 && status.st_mode != 0;
  attempt.restore();
  return is_there;
}

NameKind kind_of(std::string_view name) { return status_of(name).kind; }

// Through a handle, which follows links; what cannot be opened even for this
// is asked for by name.
FileStatus status_of(std::string_view name) {
  constexpr FileStatus k_missing = {NameKind::missing, 0, 0, false};
  Name text;
  if (!to_name(name, text)) return k_missing;
  const Attempt attempt;
  FileStatus status = k_missing;
  Information information;
  WIN32_FILE_ATTRIBUTE_DATA data;
  if (information_of(text.text, information)) {
    status = status_from(text.text, information);
  } else if (::GetFileAttributesExA(text.text, GetFileExInfoStandard, &data)) {
    status = status_from(text.text, data);
  }
  return attempt.settle(status, status.kind != NameKind::missing);
}

bool name_taken(std::string_view name) {
  Name text;
  if (is_null_device(name)) return true;
  if (!to_name(name, text)) return false;
  const Attempt attempt;
  return attempt.settle(::GetFileAttributesA(text.text) !=
                        INVALID_FILE_ATTRIBUTES);
}

bool same_file(std::string_view a, std::string_view b) {
  Name name_a;
  Name name_b;
  Information of_a;
  Information of_b;
  if (!to_name(a, name_a) || !to_name(b, name_b)) return false;
  const Attempt attempt;
  const bool are_there =
      information_of(name_a.text, of_a) && information_of(name_b.text, of_b);
  return attempt.settle(are_there) && is_one_file(of_a, of_b);
}

bool on_one_device(std::string_view from, std::string_view to) {
  const Attempt attempt;
  const bool crosses = crosses_devices(from, to);
  attempt.restore();  // nothing that this call meets is its failure
  return !crosses;
}

bool make_writable(std::string_view name) {
  Name text;
  if (!to_name(name, text)) return false;
  const Attempt attempt;
  const DWORD attributes = ::GetFileAttributesA(text.text);
  const DWORD wanted =
      attributes & ~static_cast<DWORD>(FILE_ATTRIBUTE_READONLY);
  return attempt.settle(attributes != INVALID_FILE_ATTRIBUTES &&
                        ::SetFileAttributesA(text.text, wanted) != 0);
}

bool copy_permissions(std::string_view from, std::string_view to) {
  return copy_from(from, to, set_attributes);
}

bool copy_time(std::string_view from, std::string_view to) {
  return copy_from(from, to, set_times);
}

}  // namespace zxplat
