// zxplat_posix_faults.cpp - hardware faults, the debugger and foreign
// addresses, for POSIX systems.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <fcntl.h>
#include <signal.h>
#include <sys/uio.h>
#include <ucontext.h>
#include <unistd.h>

#include <cstdlib>
#include <string_view>

#include "zxplat_posix_impl.h"

namespace zxplat {
namespace {

constinit FaultHandler fault_handler = nullptr;

// The handler runs here: the stack may be what is exhausted.  It shows the
// failure, writes files and ends the process, exit handlers included.
alignas(16) char fault_stack[256 * 1024];

struct SubCode {
  int from;
  int number;
};
constexpr SubCode k_arithmetic_codes[] = {{FPE_FLTINV, 129},
                                          {FPE_FLTDIV, 131},
                                          {FPE_FLTOVF, 132},
                                          {FPE_FLTUND, 133},
                                          {FPE_FLTRES, 134}};

// A signal that a process sent has a negative code.
int sub_code_of(const siginfo_t& info) {
  if (info.si_signo == SIGFPE) {
    for (const SubCode& row : k_arithmetic_codes)
      if (row.from == info.si_code) return row.number;
  }
  return info.si_code & 0xFF;
}

void take_place(Fault& fault, const void* context) {
#if defined(__x86_64__)
  const auto& registers =
      static_cast<const ucontext_t*>(context)->uc_mcontext.gregs;
  fault.frame = static_cast<std::uintptr_t>(registers[REG_RBP]);
  fault.instruction = static_cast<std::uintptr_t>(registers[REG_RIP]);
#else
  static_cast<void>(fault);
  static_cast<void>(context);
#endif
}

// A fault within the handler, and one that it comes back from, meets the
// system's own action: the instruction runs again and ends the process.
void on_signal(int number, siginfo_t* info, void* context) {
  ::signal(number, SIG_DFL);
  Fault fault = {number, sub_code_of(*info), 0, 0};
  take_place(fault, context);
  fault_handler(fault);
}

bool is_debugged() {
  const int fd = ::open("/proc/self/status", O_RDONLY | O_CLOEXEC);
  if (fd == k_no_fd) return false;
  char room[4096];
  const ssize_t size = ::read(fd, room, sizeof room);
  ::close(fd);
  if (size <= 0) return false;
  constexpr std::string_view k_field = "\nTracerPid:\t";
  const std::string_view text(room, static_cast<std::size_t>(size));
  const std::size_t at = text.find(k_field);
  return at != text.npos && at + k_field.size() < text.size() &&
         text[at + k_field.size()] != '0';
}

}  // namespace

void catch_faults(FaultHandler handler) {
  fault_handler = handler;
  stack_t stack = {};
  stack.ss_sp = fault_stack;
  stack.ss_size = sizeof fault_stack;
  ::sigaltstack(&stack, nullptr);
  struct sigaction action = {};
  action.sa_sigaction = on_signal;
  // Other faults meet the handler as well while it runs.
  action.sa_flags = SA_SIGINFO | SA_ONSTACK | SA_NODEFER;
  sigemptyset(&action.sa_mask);
  for (const int number : {SIGILL, SIGSEGV})
    ::sigaction(number, &action, nullptr);
  // Arithmetic leaves the stack sound, and a walk up from the handler tells
  // where it failed.
  action.sa_flags &= ~SA_ONSTACK;
  ::sigaction(SIGFPE, &action, nullptr);
}

void posix::break_into_debugger() {
  if (is_debugged()) ::raise(SIGTRAP);
}

namespace {

// Where the system's own call is not allowed, as in some containers.
ssize_t read_own_memory(std::uintptr_t from, void* out, std::size_t size) {
  const int fd = ::open("/proc/self/mem", O_RDONLY | O_CLOEXEC);
  if (fd == k_no_fd) return -1;
  const ssize_t got = ::pread(fd, out, size, static_cast<off_t>(from));
  ::close(fd);
  return got;
}

}  // namespace

bool read_memory(std::uintptr_t from, void* out, std::size_t size) {
  const iovec local = {out, size};
  const iovec remote = {reinterpret_cast<void*>(from), size};
  ssize_t got = ::process_vm_readv(::getpid(), &local, 1, &remote, 1, 0);
  if (got == -1 && (errno == EPERM || errno == ENOSYS))
    got = read_own_memory(from, out, size);
  return got == static_cast<ssize_t>(size);
}

}  // namespace zxplat
