// zxatsys_impl.h - what the sources of the failure core share, and their
// tests: the message table, the guard, the showing of a failure.
#ifndef ZXATSYS_IMPL_H
#define ZXATSYS_IMPL_H

#include <cstddef>
#include <cstdint>

#include "zxtext.h"

// A row of the message table: a format text with at most one of "%s",
// "%.140s" and "%d", each of which stands for the text argument.
struct BailMessage {
  std::int32_t number;
  const char* text;
};

// The text of the row `number`, or null if there is none.
const char* find_bail_message(std::int32_t number);

// Set on entering the core and never cleared by the library.
extern bool bail_guard;

// Long enough that no file name or text of common size is cut where the
// message shows it whole.
inline constexpr std::size_t k_bail_message_room = 16384;
// Eight numbers or cut texts, brackets and separators.
inline constexpr std::size_t k_bail_line_room = 192;
// Kept free in the message for what showing adds to it: the line, twice.
inline constexpr std::size_t k_bail_added_room = 2 * k_bail_line_room;

// Shows the failure as the program can and writes the stack dump; `message`
// gets the line added to it.
void show_failure(zxText& message, const char* line);

#endif  // ZXATSYS_IMPL_H
