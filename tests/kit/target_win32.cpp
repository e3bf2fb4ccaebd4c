// target_win32.cpp - see target.h.

#include <fcntl.h>
#include <float.h>
#include <io.h>
#include <windows.h>
#include <xmmintrin.h>

#include <cstdlib>
#include <new>

#include "target.h"

namespace kit {

bool on_windows() { return true; }

std::string full_device() { return ""; }

// The emulator shows the file system of its host as drive Z.
std::string other_device_folder() {
  const std::string folder = "Z:\\dev\\shm";
  const DWORD attributes = GetFileAttributesA(folder.c_str());
  return attributes == INVALID_FILE_ATTRIBUTES ? "" : folder;
}

// The emulator says that it made one, and makes none.
bool make_link(const std::string& target, const std::string& link) {
  return CreateSymbolicLinkA(link.c_str(), target.c_str(), 0) != 0 &&
         GetFileAttributesA(link.c_str()) != INVALID_FILE_ATTRIBUTES;
}

Pipe make_pipe() {
  int ends[2];
  if (_pipe(ends, 4096, _O_BINARY | _O_NOINHERIT) != 0) return {};
  return {ends[0], ends[1]};
}

// The runtime has a fixed number.
FewFiles::FewFiles(unsigned) : before(0) {}

FewFiles::~FewFiles() { before = 0; }

namespace {

// A multiple of the size of a page.
constexpr std::size_t k_pages = 65536;

}  // namespace

GuardedMemory::GuardedMemory(std::size_t wanted)
    : size((wanted + k_pages - 1) / k_pages * k_pages),
      start(static_cast<char*>(
          VirtualAlloc(nullptr, size + k_pages, MEM_RESERVE, PAGE_NOACCESS))) {
  if (start == nullptr ||
      VirtualAlloc(start, size, MEM_COMMIT, PAGE_READWRITE) == nullptr)
    throw std::bad_alloc();
}

GuardedMemory::~GuardedMemory() { VirtualFree(start, 0, MEM_RELEASE); }

// Both units of the processor are told: the one that the compiler uses for
// double numbers, and the older one that it uses for long double numbers.
bool trap_float_errors() {
  constexpr unsigned k_wanted =
      _EM_INVALID | _EM_ZERODIVIDE | _EM_OVERFLOW | _EM_UNDERFLOW;
  _controlfp(0, k_wanted);
  _MM_SET_EXCEPTION_MASK(_MM_GET_EXCEPTION_MASK() &
                         ~unsigned{_MM_MASK_INVALID | _MM_MASK_DIV_ZERO |
                                   _MM_MASK_OVERFLOW | _MM_MASK_UNDERFLOW});
  return true;
}

void set_variable(const std::string& name, const char* value) {
  // The runtime passes it on to the system, and removes what is empty.
  _putenv((name + "=" + (value != nullptr ? value : "")).c_str());
}

}  // namespace kit
