// zxplat_posix_impl.h - private to zxplat_posix*.cpp: from a name in Win32
// form to a path of the system, and from errno to the library's numbers.
//
// The functions on paths speak errno, so that they combine with system
// calls; only fail() and fail_on() turn it into last_error().  A path is
// changed in place by find(): a component spelled in another case keeps its
// length, hence every offset into the text stays good.
#ifndef ZXPLAT_POSIX_IMPL_H
#define ZXPLAT_POSIX_IMPL_H

#include <cerrno>
#include <cstddef>
#include <string_view>

#include "zxplat.h"

namespace zxplat::posix {

// A native path, closed by a NUL.  Some four kilobytes; it lives on the
// stack of one call.
struct Path {
  char text[k_max_name + 1];
  std::size_t length;
};

// True for a name of the printer, which this system has none of.
bool is_printer(std::string_view name);

// True for the one drive there is, as in "C:" and "c:\\".
bool is_drive_form(std::string_view name);

// Turns a name into a path: slashes, and no drive.  False with the number
// set if no file can have that name; the null device is none.
bool to_path(std::string_view name, Path& path);

// Looks for the path component by component, each exactly as spelled first
// and then without regard to ASCII case, and puts the spelling found into
// the path.  0, or the errno that ended the search; the components ahead of
// the missing one are respelled all the same.  A link counts as found,
// wherever it leads.
int find(Path& path);

// Where the last component begins; slashes behind it belong to it.
std::size_t last_component(const Path& path);

// The part ahead of it as a path of its own; "." if there is none.
void folder_of(const Path& path, Path& folder);

// True if errno says that a component was not there as spelled.
inline bool is_absent(int error) { return error == ENOENT || error == ENOTDIR; }

// Repeats a call of the system for as long as a signal cuts it short.
template <typename Call>
auto retry(const Call& call) {
  auto result = call();
  while (result == -1 && errno == EINTR) result = call();
  return result;
}

// Carries out a call on a path that exists: as spelled, and if that is not
// there, as find() spells it.  The call's result; -1 leaves its errno.
template <typename Call>
auto on_existing(Path& path, const Call& call) {
  auto result = call(static_cast<const char*>(path.text));
  if (result != -1 || !is_absent(errno)) return result;
  if (const int error = find(path); error != 0) {
    errno = error;
    return result;
  }
  return call(static_cast<const char*>(path.text));
}

// The calls of FileCalls on folders and disks.
bool make_folder(std::string_view name);
bool remove_folder(std::string_view name);
bool disk_space(char letter, DiskSpace& space);

// Stops in the debugger if one is attached.
void break_into_debugger();

// Stores the number of a failed call.  Always false, for the caller to
// return.
bool fail_with(int number);

// The same from errno, for calls on descriptors.
bool fail();

// The same from errno, for calls on names.  `taken` is the number for a name
// that exists already: creating and renaming have different ones.
bool fail_on(const Path& path, int taken = k_err_exists);

}  // namespace zxplat::posix

#endif  // ZXPLAT_POSIX_IMPL_H
