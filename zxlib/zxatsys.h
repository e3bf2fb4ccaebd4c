// zxatsys.h - the one way of failing: message, diagnostic line, process end.
//
// A routine that cannot go on calls an entry of the bail family.  The core
// builds a message from the numbered message table and a diagnostic line in
// square brackets, shows both on the console, waits two seconds and ends the
// process with exit code 100, so that exit handlers run.  Nothing unwinds
// the stack.
//
// NOTE: the entries can return.  While a failure is being handled, another
// one is dropped and its caller goes on; every call site must be safe then:
// it returns a neutral value and touches nothing that the failed test
// guarded.
//
// The core uses static buffers and the platform alone, so it works when the
// heap or a string is broken.  Process-wide state: the guard, the buffers,
// the hooks below.
#ifndef ZXATSYS_H
#define ZXATSYS_H

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "zxmisc.h"

// Exit codes of the library.
inline constexpr int k_exit_usage = 1;
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
// as "number: " and the text cut to 140 bytes; number 0 is a free text.
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

// ------------------------------------------------------------------ hooks --

// What the core asks of upper floors.  The defaults do without them.
struct BailHooks {
  // The path and the version of the program, as the screen shows them.
  const char* (*program_path)();
  const char* (*program_version)();

  // Writes to standard output behind all that was written to it before,
  // down to the descriptor.
  void (*print)(std::string_view text);
};
extern BailHooks bail_hooks;

// The default of BailHooks::print: straight to the descriptor.
void bail_print_directly(std::string_view text);

// The seconds for which the failure screen stands before the process ends.
// Programs leave it alone; tests shorten it.
extern std::int64_t bail_wait_seconds;

// ------------------------------------------------------------ bounded text --

// Composes NUL-terminated text in a buffer of fixed size; what does not fit
// is cut off.  The buffer must have room for one byte at least.
class zxText {
 public:
  // Starts behind the first `length` bytes of `buffer`, which stay.
  explicit zxText(std::span<char> buffer, std::size_t length = 0);

  void add(std::string_view text);
  void add(std::string_view text, std::size_t at_most);
  void add_int(std::int32_t number);

  std::size_t length() const { return used; }
  std::string_view view() const { return {room.data(), used}; }

 private:
  std::span<char> room;
  std::size_t used;
};

#endif  // ZXATSYS_H
