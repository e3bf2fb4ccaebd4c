// target_posix.cpp - see target.h.

#include <fcntl.h>
#include <fenv.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <new>

#include "target.h"

// Tests ask for more memory than there is, and want to see null.
extern "C" const char* __asan_default_options();
extern "C" const char* __asan_default_options() {
  return "allocator_may_return_null=1";
}

namespace kit {

bool on_windows() { return false; }

std::string full_device() {
  return access("/dev/full", W_OK) == 0 ? "\\dev\\full" : "";
}

std::string other_device_folder() {
  struct stat here;
  const std::string temp = std::filesystem::temp_directory_path().string();
  if (stat(temp.c_str(), &here) != 0) return "";
  for (const char* folder : {"/dev/shm", "/run", "/var/tmp"}) {
    struct stat there;
    const bool is_other =
        stat(folder, &there) == 0 && there.st_dev != here.st_dev;
    if (is_other && access(folder, W_OK) == 0) return folder;
  }
  return "";
}

bool make_link(const std::string& target, const std::string& link) {
  return symlink(target.c_str(), link.c_str()) == 0;
}

Pipe make_pipe() {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) return {};
  return {ends[0], ends[1]};
}

FewFiles::FewFiles(unsigned count) {
  rlimit limit = {};
  getrlimit(RLIMIT_NOFILE, &limit);
  before = limit.rlim_cur;
  limit.rlim_cur = count;
  setrlimit(RLIMIT_NOFILE, &limit);
}

FewFiles::~FewFiles() {
  rlimit limit = {};
  getrlimit(RLIMIT_NOFILE, &limit);
  limit.rlim_cur = before;
  setrlimit(RLIMIT_NOFILE, &limit);
}

namespace {

// A multiple of the size of a page.
constexpr std::size_t k_pages = 65536;

}  // namespace

GuardedMemory::GuardedMemory(std::size_t wanted)
    : size((wanted + k_pages - 1) / k_pages * k_pages) {
  void* const found = mmap(nullptr, size + k_pages, PROT_NONE,
                           MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (found == MAP_FAILED) throw std::bad_alloc();
  start = static_cast<char*>(found);
  if (mprotect(start, size, PROT_READ | PROT_WRITE) != 0)
    throw std::bad_alloc();
}

GuardedMemory::~GuardedMemory() { munmap(start, size + k_pages); }

bool trap_float_errors() {
  return feenableexcept(FE_INVALID | FE_DIVBYZERO | FE_OVERFLOW |
                        FE_UNDERFLOW) != -1;
}

void set_variable(const std::string& name, const char* value) {
  if (value == nullptr) {
    unsetenv(name.c_str());
  } else {
    setenv(name.c_str(), value, 1);
  }
}

}  // namespace kit
