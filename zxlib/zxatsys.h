// zxatsys.h - the one way of failing: message, diagnostic line, process end.
//
// A routine that cannot go on calls an entry of the bail family.  The core
// runs the emergency functions, builds a message from the numbered message
// table and a diagnostic line in square brackets, gives the program's hook
// and the module manager their say, shows both texts on the console (a
// program without one shows a message box first), writes a stack dump, waits
// two seconds and ends the process with exit code 100, so that exit handlers
// run.  Nothing unwinds the stack.
//
//   1004: create: Can't open file 'no\such' for writing
//              [1004-1004-0/3-0/3/no\such/]
//
// NOTE: the entries can return.  While a failure is being handled, another
// one is dropped and its caller goes on; every call site must be safe then:
// it returns a neutral value and touches nothing that the failed test
// guarded.  A program without a console says "Cleanup Failure" each time.
//
// The core uses static buffers and the platform alone, so it works when the
// heap or a string is broken.  Process-wide state: the guard, the buffers,
// the emergency table, the hooks below.
#ifndef ZXATSYS_H
#define ZXATSYS_H

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "zxmisc.h"

// Exit codes of the library.
inline constexpr int k_exit_usage = 1;
inline constexpr int k_exit_early_allocation = 9;
inline constexpr int k_exit_failure = 100;

// What a failing routine can add to its message: a number and a text, either
// of which may be missing (0, null).  The text is not owned.
struct BailDetail {
  std::int32_t number = 0;
  const char* text = nullptr;

  constexpr BailDetail() = default;
  constexpr BailDetail(std::int32_t detail_number,
                       const char* detail_text = nullptr)
      : number(detail_number), text(detail_text) {}
};

// The shared empty detail.
inline constexpr BailDetail no_detail;

// ---------------------------------------------------------------- entries --

// Each ends the process with the row `number` of the message table, its "%s"
// replaced by `text` (null counts as empty).  A number without a row shows
// as "number: " and the text cut to 140 bytes; number 0 is a free text.  A
// text that begins with "=" is quiet: it is shown without the diagnostic
// line, a blank in place of the "=".
void bail_code(std::int32_t number);
void bail_code(std::int32_t number, const char* text,
               const BailDetail& detail = no_detail);
void bail_detail(std::int32_t number, const BailDetail& detail);
void bail_detail(std::int32_t number, const char* text,
                 const BailDetail& detail);

// An internal error: message 1000 with the position "file:line", which is
// stored in zx_pos as well.
void assert_fail(std::int32_t line, const char* file);

// The check behind ZX_ASSERT: fails unless `ok`; returns `ok`, so that the
// caller can step back when the failure was dropped.
inline bool zx_check(bool ok, const char* module, std::int32_t line) {
  if (!ok) [[unlikely]]
    assert_fail(line, module);
  return ok;
}

// An internal assertion that stays in every build; its value is the
// condition:
//   if (!ZX_ASSERT(i < count)) return fallback;
#define ZX_ASSERT(condition) \
  zx_check(static_cast<bool>(condition), ZX_MODULE, __LINE__)

// The same with a fixed position that is part of the contract.
#define ZX_ASSERT_AT(condition, module, line) \
  zx_check(static_cast<bool>(condition), module, line)

// Says the text in the system's last-words box (standard error where there
// is none) and ends the process at once with exit code 100: no message, no
// dump, no exit handlers.  A debugger, if one is attached, stops first.
void fatal_exit(const char* text);

// --------------------------------------------------- the program's hooks --

// Called with the message and the diagnostic line ahead of their showing.
// Failures inside are dropped.
using zxBailHook = void (*)(const char* message, const char* line);
extern zxBailHook bail_hook;
// A second slot, which the core does not call.
extern zxBailHook bail_hook_early;

// Stores `hook` in bail_hook if `which`, otherwise in bail_hook_early; the
// old value.
zxBailHook set_bail_hook(zxBailHook hook, bool which);

// The text ahead of the message in the box of a program without a console;
// empty by default.  Not owned.
extern const char* bail_prefix;

// The emergency table: functions that put the world in order when the
// process fails, at most six pairs.
using zxEmergency = void (*)();
inline constexpr std::size_t k_max_emergencies = 6;

// Adds a pair, of which either may be null, and returns `first`.  A seventh
// pair fails an assertion and is not added.
zxEmergency at_emergency(zxEmergency first, zxEmergency second);

// Calls the `first` functions, the last added first: the core does this
// before anything else.
void run_emergency_first();

// Calls the `second` functions, the first added first; for programs.
void run_emergency_second();

// ------------------------------------------------------ faults and maths --

// Once per process: hardware faults (a bad address, an illegal instruction,
// arithmetic, an exhausted stack) end the process as failures with a stack
// dump of their place: message 1001, for arithmetic 3000, 3002 or 3003.  The
// detail's number is signal x 100 + sub-code % 100.
void install_fault_handlers();

// What a mathematical function could not compute.
struct zxMathError {
  std::int32_t type;
  const char* name;  // of the function
  double arg1;
  double arg2;
  double result;
};
inline constexpr std::int32_t k_math_underflow = 4;

// Accepts an underflow with the result 0 and returns 1; any other is message
// 3004 with the type and the name (0, if that is dropped).
int math_error(zxMathError& record);

// ---------------------------------------------------------- printed report --

// For a site with a printer: prints the message and up to 50 lines of the
// stack dump file on the device "prn", or else "lpt1"; without either it does
// nothing.
void print_fatal_report(const char* message);

// -------------------------------------------------------- upper floors --

// What the core asks of upper floors.  The defaults do without them.
struct BailHooks {
  // The path, the name and the version of the program.
  const char* (*program_path)();
  const char* (*program_name)();
  const char* (*program_version)();

  // Writes to standard output behind all that was written to it before,
  // down to the descriptor.
  void (*print)(std::string_view text);

  // The stack dump; see dump_stack().
  void (*dump)(std::uint32_t check, const char* message);

  // Hands a failure to the module manager, behind the program's hook.
  void (*tell_modules)(const char* message, const char* line);
};
extern BailHooks bail_hooks;

// The default of BailHooks::print: straight to the descriptor.
void bail_print_directly(std::string_view text);

// The seconds for which the failure screen stands before the process ends.
// Programs leave it alone; tests shorten it.
extern std::int64_t bail_wait_seconds;

#endif  // ZXATSYS_H
