// zxatsys_impl.h - the failure core's message table and guard, for the core
// itself and for its tests.
#ifndef ZXATSYS_IMPL_H
#define ZXATSYS_IMPL_H

#include <cstdint>

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

#endif  // ZXATSYS_IMPL_H
