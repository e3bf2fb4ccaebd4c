// zxplat_win32_faults.cpp - hardware faults, the debugger and foreign
// addresses, for Windows.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <signal.h>
#include <windows.h>

#include <cstring>
#include <iterator>

#include "zxplat_win32_impl.h"

namespace zxplat {
namespace {

constexpr int k_illegal = 4;
constexpr int k_arithmetic = 8;
constexpr int k_bad_address = 11;

// The sub-code of a signal that the process itself sent.
constexpr int k_sent = 250;

struct FaultRow {
  DWORD exception;
  int signal;
  int sub_code;
};
constexpr FaultRow k_rows[] = {
    {EXCEPTION_INT_DIVIDE_BY_ZERO, k_arithmetic, 1},
    {EXCEPTION_INT_OVERFLOW, k_arithmetic, 2},
    {EXCEPTION_FLT_INVALID_OPERATION, k_arithmetic, 129},
    {EXCEPTION_FLT_DENORMAL_OPERAND, k_arithmetic, 130},
    {EXCEPTION_FLT_DIVIDE_BY_ZERO, k_arithmetic, 131},
    {EXCEPTION_FLT_OVERFLOW, k_arithmetic, 132},
    {EXCEPTION_FLT_UNDERFLOW, k_arithmetic, 133},
    {EXCEPTION_FLT_INEXACT_RESULT, k_arithmetic, 134},
    {EXCEPTION_FLT_STACK_CHECK, k_arithmetic, 135},
    {EXCEPTION_ILLEGAL_INSTRUCTION, k_illegal, 2},
    {EXCEPTION_PRIV_INSTRUCTION, k_illegal, 5},
    {EXCEPTION_ACCESS_VIOLATION, k_bad_address, 1},
    {EXCEPTION_STACK_OVERFLOW, k_bad_address, 1},
    {EXCEPTION_IN_PAGE_ERROR, k_bad_address, 2},
    {EXCEPTION_DATATYPE_MISALIGNMENT, k_bad_address, 3},
};

constinit FaultHandler fault_handler = nullptr;
constinit Fault current_fault = {};

// The handler runs here: the stack may be what is exhausted.
alignas(16) char fault_stack[256 * 1024];
// What the system itself needs to report an exhausted stack.
constexpr ULONG k_reporting_room = 64 * 1024;

// SSE arithmetic has two exceptions for all that can go wrong in it; its
// control word tells what did: six flags and, seven bits above, their masks.
constexpr DWORD k_sse_faults = 0xC00002B4;
constexpr DWORD k_sse_traps = 0xC00002B5;
constexpr int k_sse_sub_codes[] = {129, 130, 131, 132, 133, 134};

int sse_sub_code(const CONTEXT& registers) {
  constexpr std::size_t k_control_word = 24;
  DWORD control;
  std::memcpy(&control, registers.ExtendedRegisters + k_control_word,
              sizeof control);
  const DWORD found = control & ~(control >> 7);
  for (std::size_t i = 0; i < std::size(k_sse_sub_codes); ++i)
    if ((found >> i & 1) != 0) return k_sse_sub_codes[i];
  return k_sse_sub_codes[0];
}

// The signal and the sub-code of an exception; false if it is none of ours.
bool tell_fault(DWORD exception, const CONTEXT& registers, Fault& fault) {
  if (exception == k_sse_faults || exception == k_sse_traps) {
    fault.signal = k_arithmetic;
    fault.sub_code = sse_sub_code(registers);
    return true;
  }
  for (const FaultRow& row : k_rows) {
    if (row.exception != exception) continue;
    fault.signal = row.signal;
    fault.sub_code = row.sub_code;
    return true;
  }
  return false;
}

// Where the thread goes on behind the fault; there is no way back.
[[gnu::force_align_arg_pointer]] void handle_fault() {
  fault_handler(current_fault);
  ::TerminateProcess(::GetCurrentProcess(), 3);
}

DWORD address_of(const void* place) {
  return static_cast<DWORD>(reinterpret_cast<std::uintptr_t>(place));
}

// Has the thread go on in handle_fault() as if the place of the fault had
// called it, with the stack below `top`.
void call_on_stack(CONTEXT& registers, DWORD top) {
  top = (top & ~DWORD{15}) - sizeof(DWORD);
  std::memcpy(reinterpret_cast<void*>(top), &registers.Eip, sizeof(DWORD));
  registers.Esp = top;
  registers.Eip = address_of(reinterpret_cast<const void*>(handle_fault));
}

LONG WINAPI on_exception(EXCEPTION_POINTERS* found) {
  CONTEXT& registers = *found->ContextRecord;
  Fault& fault = current_fault;
  if (!tell_fault(found->ExceptionRecord->ExceptionCode, registers, fault))
    return EXCEPTION_CONTINUE_SEARCH;
  ::SetUnhandledExceptionFilter(nullptr);  // the next one is the system's
  fault.frame = registers.Ebp;
  fault.instruction = registers.Eip;
  call_on_stack(registers, fault.signal == k_arithmetic
                               ? registers.Esp
                               : address_of(std::end(fault_stack) - 64));
  return EXCEPTION_CONTINUE_EXECUTION;
}

void on_signal(int number) { fault_handler(Fault{number, k_sent, 0, 0}); }

bool is_readable(const MEMORY_BASIC_INFORMATION& region) {
  constexpr DWORD k_closed = PAGE_NOACCESS | PAGE_GUARD | PAGE_EXECUTE;
  return region.State == MEM_COMMIT && (region.Protect & k_closed) == 0;
}

bool can_read(std::uintptr_t from, std::size_t size) {
  const std::uintptr_t end = from + size;
  if (end < from) return false;
  for (std::uintptr_t at = from; at < end;) {
    MEMORY_BASIC_INFORMATION region;
    if (::VirtualQuery(reinterpret_cast<const void*>(at), &region,
                       sizeof region) == 0 ||
        !is_readable(region))
      return false;
    at = reinterpret_cast<std::uintptr_t>(region.BaseAddress) +
         region.RegionSize;
  }
  return true;
}

}  // namespace

void catch_faults(FaultHandler handler) {
  fault_handler = handler;
  ::SetErrorMode(SEM_FAILCRITICALERRORS);
  ULONG room = k_reporting_room;
  ::SetThreadStackGuarantee(&room);
  ::SetUnhandledExceptionFilter(on_exception);
  for (const int number : {SIGFPE, SIGILL, SIGSEGV})
    ::signal(number, on_signal);
}

void win32::break_into_debugger() {
  if (::IsDebuggerPresent()) ::DebugBreak();
}

bool read_memory(std::uintptr_t from, void* out, std::size_t size) {
  const win32::Attempt attempt;
  const bool readable = can_read(from, size);
  if (readable) std::memcpy(out, reinterpret_cast<const void*>(from), size);
  attempt.restore();
  return readable;
}

}  // namespace zxplat
