// zxplat_win32_impl.h - private to zxplat_win32*.cpp: what the calls of the
// runtime and of the system do to the last error, and names closed by a NUL.
#ifndef ZXPLAT_WIN32_IMPL_H
#define ZXPLAT_WIN32_IMPL_H

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "zxplat.h"

namespace zxplat::win32 {

// Stands around the calls of one operation.  They may leave any number
// behind even when they succeed; settle() puts things right.
class Attempt {
 public:
  Attempt();

  // Passes `result` on.  Success restores the number from before, failure
  // sees to it that there is one and that it is the library's.
  template <typename Result>
  Result settle(Result result, bool is_good) const {
    is_good ? restore() : settle_failure();
    return result;
  }

  bool settle(bool is_good) const { return settle(is_good, is_good); }

  void restore() const;

 private:
  static void settle_failure();

  int before;
};

// A name for the system's calls.  Some four kilobytes; it lives on the stack
// of one call.
struct Name {
  char text[k_max_name + 1];
};

// Closes a name by a NUL.  False with the number set if no file can have
// that name; the null device is none.
bool to_name(std::string_view name, Name& out);

// A time of the system, in tenths of microseconds from 1601-01-01 on and in
// two halves, as seconds since 1970-01-01.
std::int64_t seconds_since_1970(std::uint32_t high, std::uint32_t low);

// The calls of FileCalls on folders and disks.
bool make_folder(std::string_view name);
bool remove_folder(std::string_view name);
bool disk_space(char letter, DiskSpace& space);

// Stops in the debugger if one is attached.
void break_into_debugger();

// Stores the number of a failed call.  Always false, for the caller to
// return.
bool fail_with(int number);

}  // namespace zxplat::win32

#endif  // ZXPLAT_WIN32_IMPL_H
