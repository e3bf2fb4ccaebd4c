// target.h - the test kit: what the system under the tests offers, for tests
// that need a certain kind of file or descriptor.
//
// A test asks for the thing that it needs and is skipped without it; it does
// not ask for the target.  on_windows() is for the few matters on which the
// two targets are meant to differ.
#ifndef KIT_TARGET_H
#define KIT_TARGET_H

#include <cstddef>
#include <string>

namespace kit {

// True on the Windows target, emulated or not.
bool on_windows();

// A device that takes no byte, as a name for the library; empty if the
// system has none.
std::string full_device();

// A folder on another device than that of the temporary folder, as a name
// for the library and the standard library; empty if there is none.
std::string other_device_folder();

// Makes a symbolic link; false if a program cannot do so here.
bool make_link(const std::string& target, const std::string& link);

// Makes a pipe.  The ends are descriptors of the library; -1 on failure.
struct Pipe {
  int reader = -1;
  int writer = -1;
};
Pipe make_pipe();

// Lowers the number of files that the process may hold open, as far as the
// system lets it be lowered.  The old number comes back at the end.
class FewFiles {
 public:
  explicit FewFiles(unsigned count);
  FewFiles(const FewFiles&) = delete;
  FewFiles& operator=(const FewFiles&) = delete;
  ~FewFiles();

 private:
  unsigned long long before;
};

// Memory that can be read and written, whole pages of at least `size` bytes,
// and behind its end a stretch that can be neither.
class GuardedMemory {
 public:
  // Throws std::bad_alloc if there is none.
  explicit GuardedMemory(std::size_t size);
  GuardedMemory(const GuardedMemory&) = delete;
  GuardedMemory& operator=(const GuardedMemory&) = delete;
  ~GuardedMemory();

  char* begin() const { return start; }
  char* end() const { return start + size; }

 private:
  std::size_t size;
  char* start;
};

// Makes invalid operations, divisions by zero, overflows and underflows of
// floating-point numbers hardware faults from now on; false if that is not to
// be had here.
bool trap_float_errors();

// Sets a variable of the environment as the library sees it; null removes
// it.
void set_variable(const std::string& name, const char* value);

}  // namespace kit

#endif  // KIT_TARGET_H
