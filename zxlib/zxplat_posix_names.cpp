// zxplat_posix_names.cpp - names of the library as paths of the system, and
// errno as the library's numbers.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <dirent.h>
#include <fcntl.h>
#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>

#include "zxplat_posix_impl.h"

namespace zxplat::posix {
namespace {

// Room for a batch of directory entries; a few dozen usual names.
constexpr std::size_t k_entries_size = 4096;

struct ErrorRow {
  int system;
  int number;
};

constexpr ErrorRow k_error_rows[] = {
    {ENOTDIR, k_err_path_not_found},
    {ELOOP, k_err_path_not_found},
    {EACCES, k_err_denied},
    {EPERM, k_err_denied},
    {EISDIR, k_err_denied},
    {EROFS, k_err_write_protected},
    {EXDEV, k_err_other_device},
    {EEXIST, k_err_exists},
    {ENOTEMPTY, 145},
    {ENOSPC, k_err_disk_full},
    {EDQUOT, k_err_disk_full},
    {EMFILE, k_err_too_many_open},
    {ENFILE, k_err_too_many_open},
    {EBADF, k_err_bad_handle},
    {ENOMEM, k_err_no_memory},
    {EPIPE, k_err_broken_pipe},
    {EINVAL, k_err_bad_parameter},
    {ENAMETOOLONG, k_err_bad_name},
    {ENOENT, k_err_path_not_found},
};

int number_of(int error) {
  for (const ErrorRow& row : k_error_rows) {
    if (row.system == error) return row.number;
  }
  return k_err_io;
}

// What no name can have on Windows.  A colon is let through: it is usual here.
constexpr std::string_view k_refused_bytes("*?\"<>|\0", 7);

constexpr bool is_slash(char c) { return c == '\\' || c == '/'; }

constexpr char fold(char c) {
  return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

constexpr bool is_letter(char c) { return fold(c) >= 'a' && fold(c) <= 'z'; }

constexpr char raise(char c) {
  return is_letter(c) ? static_cast<char>(fold(c) - 'a' + 'A') : c;
}

bool folds_alike(std::string_view a, std::string_view b) {
  return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                    [](char x, char y) { return fold(x) == fold(y); });
}

bool has_drive(std::string_view name) {
  return name.size() >= 2 && name[1] == ':' && is_letter(name[0]);
}

bool is_unc(std::string_view name) {
  return name.size() >= 2 && is_slash(name[0]) && is_slash(name[1]);
}

// The number that refuses a name by its form alone, or k_err_none.
int refusal(std::string_view name) {
  if (name.empty()) return k_err_path_not_found;
  if (name.find_first_of(k_refused_bytes) != name.npos) return k_err_bad_name;
  if (name.size() > k_max_name) return k_err_bad_name;
  if (is_null_device(name) || is_printer(name)) return k_err_not_found;
  if (is_unc(name)) return k_err_path_not_found;
  if (has_drive(name) && fold(name[0]) != 'c') return k_err_path_not_found;
  return k_err_none;
}

void store(std::string_view text, Path& path) {
  std::memcpy(path.text, text.data(), text.size());
  path.text[text.size()] = '\0';
  path.length = text.size();
}

// Scans one batch of entries for the first in byte order, `best` included,
// that folds like `wanted`.
void scan_entries(const char* entries, std::size_t size,
                  std::string_view wanted, char* best) {
  for (std::size_t at = 0; at < size;) {
    const auto* entry = reinterpret_cast<const dirent64*>(entries + at);
    at += entry->d_reclen;
    if (!folds_alike(wanted, entry->d_name)) continue;
    if (*best == '\0' || std::strcmp(entry->d_name, best) < 0) {
      std::memcpy(best, entry->d_name, wanted.size() + 1);
    }
  }
}

// Reads an open folder to its end.  The entries are taken from the system
// directly, since the C library's folder streams allocate.
int scan_folder(int fd, std::string_view wanted, char* best) {
  alignas(dirent64) char entries[k_entries_size];
  for (;;) {
    const ssize_t size = getdents64(fd, entries, sizeof entries);
    if (size < 0) return errno;
    if (size == 0) return *best == '\0' ? ENOENT : 0;
    scan_entries(entries, static_cast<std::size_t>(size), wanted, best);
  }
}

// Looks through `folder` for a name like `wanted`.  A folder that may not be
// listed has no other spellings.
int find_in_folder(const char* folder, std::string_view wanted, char* best) {
  const int fd =
      retry([&] { return ::open(folder, O_RDONLY | O_DIRECTORY | O_CLOEXEC); });
  if (fd == -1) return errno == EACCES || errno == EPERM ? ENOENT : errno;
  const int error = scan_folder(fd, wanted, best);
  ::close(fd);
  return error;
}

bool is_there(const char* path) {
  struct stat status;
  return ::lstat(path, &status) == 0;
}

// The last path that was found in another spelling, as it was asked for and
// as it is on the disk: else a walk over the files of a folder would list
// the folders above it once for each.
struct Respelling {
  char asked[k_max_name + 1];
  char found[k_max_name + 1];
  std::size_t length;

  void remember(const char* asked_path, const char* path, std::size_t size) {
    std::memcpy(asked, asked_path, size);
    std::memcpy(found, path, size);
    asked[size] = '\0';
    length = size;
  }

  // True if both paths begin with the path up to `end`, a component's.
  bool knows(const char* asked_path, std::size_t end) const {
    const bool is_end = asked[end] == '/' || asked[end] == '\0';
    return end <= length && is_end && std::memcmp(asked, asked_path, end) == 0;
  }
};
constinit Respelling last_respelling = {};

// A path on its way to the spelling on the disk, and as it was asked for.
struct Search {
  char* text;
  char asked[k_max_name + 1];
  bool is_respelled = false;

  explicit Search(Path& path) : text(path.text) {
    std::memcpy(asked, path.text, path.length + 1);
  }

  // These look for another spelling of the component [begin, end), which is
  // not there as it stands and ends in a NUL for the time being.
  bool try_spelling(const char* spelling, std::size_t begin, std::size_t end);
  bool try_capitals(std::size_t begin, std::size_t end);
  bool try_last_time(std::size_t begin, std::size_t end);
  int list(std::size_t begin, std::size_t end);
  int respell(std::size_t begin, std::size_t end);

  int find_component(std::size_t begin, std::size_t end);
};

bool Search::try_spelling(const char* spelling, std::size_t begin,
                          std::size_t end) {
  char wanted[NAME_MAX + 1];
  std::memcpy(wanted, text + begin, end - begin);
  std::memcpy(text + begin, spelling, end - begin);
  if (is_there(text)) return true;
  std::memcpy(text + begin, wanted, end - begin);
  return false;
}

// Capitals are the first spelling in byte order, and that of old disks.
bool Search::try_capitals(std::size_t begin, std::size_t end) {
  char capitals[NAME_MAX + 1];
  std::transform(text + begin, text + end, capitals, raise);
  return try_spelling(capitals, begin, end);
}

bool Search::try_last_time(std::size_t begin, std::size_t end) {
  const Respelling& last = last_respelling;
  return last.knows(asked, end) && std::memcmp(text, last.found, begin) == 0 &&
         try_spelling(last.found + begin, begin, end);
}

int Search::list(std::size_t begin, std::size_t end) {
  char wanted[NAME_MAX + 1];
  char best[NAME_MAX + 1] = "";
  std::memcpy(wanted, text + begin, end - begin);
  text[begin] = '\0';
  const int error =
      find_in_folder(begin == 0 ? "." : text, {wanted, end - begin}, best);
  std::memcpy(text + begin, error == 0 ? best : wanted, end - begin);
  return error;
}

int Search::respell(std::size_t begin, std::size_t end) {
  if (end - begin > NAME_MAX) return ENAMETOOLONG;
  if (std::none_of(text + begin, text + end, is_letter)) return ENOENT;
  if (try_capitals(begin, end) || try_last_time(begin, end)) return 0;
  return list(begin, end);
}

int Search::find_component(std::size_t begin, std::size_t end) {
  const char kept = text[end];
  text[end] = '\0';
  int error = is_there(text) ? 0 : errno;
  if (error == ENOENT) {
    error = respell(begin, end);
    if (error == 0) is_respelled = true;
  }
  text[end] = kept;
  return error;
}

bool is_folder(const Path& path) {
  struct stat status;
  return ::stat(path.text, &status) == 0 && S_ISDIR(status.st_mode);
}

}  // namespace

bool is_printer(std::string_view name) {
  return folds_alike(name, "prn") || folds_alike(name, "lpt1");
}

bool is_drive_form(std::string_view name) {
  if (!has_drive(name) || fold(name[0]) != 'c') return false;
  return name.size() == 2 || (name.size() == 3 && is_slash(name[2]));
}

bool to_path(std::string_view name, Path& path) {
  if (const int number = refusal(name)) return fail_with(number);
  if (has_drive(name)) name.remove_prefix(2);
  store(name.empty() ? "." : name, path);
  std::replace(path.text, path.text + path.length, '\\', '/');
  return true;
}

int find(Path& path) {
  Search search(path);
  const std::string_view text(path.text, path.length);
  std::size_t found = 0;
  int error = 0;
  std::size_t begin = text.find_first_not_of('/');
  while (begin != text.npos) {
    const std::size_t end = std::min(text.find('/', begin), text.size());
    error = search.find_component(begin, end);
    if (error != 0) break;
    found = end;
    begin = text.find_first_not_of('/', end);
  }
  if (search.is_respelled)
    last_respelling.remember(search.asked, path.text, found);
  return error;
}

std::size_t last_component(const Path& path) {
  const std::string_view text(path.text, path.length);
  const std::size_t end = text.find_last_not_of('/');
  if (end == text.npos) return 0;
  return text.rfind('/', end) + 1;  // npos + 1 is 0
}

void folder_of(const Path& path, Path& folder) {
  const std::size_t length = last_component(path);
  store(length == 0 ? "." : std::string_view(path.text, length), folder);
  // The root alone has no component, and is its own folder.
  if (path.text[0] == '/' && length == 0) store("/", folder);
}

bool fail_with(int number) {
  set_last_error(number);
  return false;
}

bool fail() { return fail_with(number_of(errno)); }

bool fail_on(const Path& path, int taken) {
  const int error = errno;
  if (error == EEXIST) return fail_with(taken);
  if (error != ENOENT) return fail_with(number_of(error));
  Path folder;
  folder_of(path, folder);
  return fail_with(is_folder(folder) ? k_err_not_found : k_err_path_not_found);
}

}  // namespace zxplat::posix
