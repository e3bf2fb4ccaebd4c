// faults.h - making the n-th system call of a kind fail.
#ifndef KIT_FAULTS_H
#define KIT_FAULTS_H

#include <string>

#include "zxplat.h"

namespace kit {

// The kinds of calls of zxplat::FileCalls.
enum class Call {
  open,
  read,
  write,
  flush,
  seek,
  size,
  set_size,
  lock,
  unlock,
  close,
  rename,
  remove,
  make_folder,
  remove_folder,
  bind,
  disk_space
};
inline constexpr int k_calls = 16;
const char* name_of(Call call);

// While one lives, calls are counted, and those that it was told to fail do.
// A failing close still closes, a failing write writes nothing.
class Faults {
 public:
  Faults();
  ~Faults();
  Faults(const Faults&) = delete;
  Faults& operator=(const Faults&) = delete;

  // Makes the n-th call from now on fail (1 is the next), with this system
  // error.  A rename with k_err_other_device says so in its result too.
  void fail_nth(Call call, int n, int error = zxplat::k_err_io);

  // Makes every call from now on fail.
  void fail_all(Call call, int error = zxplat::k_err_io);

  // Counts every write as short: at most `bytes` go through at once.
  void limit_writes(std::size_t bytes);

  int count(Call call) const;

  // Reads "write:3", or "rename:1:17" with the system error, as the wish to
  // fail the third write; false if it is neither.
  bool parse(const std::string& wish);
};

}  // namespace kit

#endif  // KIT_FAULTS_H
