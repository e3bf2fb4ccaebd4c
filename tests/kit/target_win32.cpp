// target_win32.cpp - see target.h.

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <cstdlib>

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

void set_variable(const std::string& name, const char* value) {
  // The runtime passes it on to the system, and removes what is empty.
  _putenv((name + "=" + (value != nullptr ? value : "")).c_str());
}

}  // namespace kit
