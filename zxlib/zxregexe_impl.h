// zxregexe_impl.h - what the sources of the matcher share.  Not installed.
#ifndef ZXREGEXE_IMPL_H
#define ZXREGEXE_IMPL_H

#include <cstdint>

#include "zxregexc_impl.h"
#include "zxregexe.h"

namespace zxregexe {

// ------------------------------------------------------------- searching --

// In place of the byte ahead of a subject: there is none.
inline constexpr int k_at_start = -1;

// False, as a failure, if a run can't be made; true if it can.
bool can_run(const zxRegex* regex, const char* subject, const char* end);

// True if the literal stands nowhere in the subject.
bool is_missing(const char* literal, std::size_t length, const char* start,
                const char* end);

// True if the subject lacks what the header says that any match must have.
inline bool is_rejected(const zxRegex& regex, const char* start,
                        const char* end) {
  if (regex.reganch == 2 &&
      (start == end || static_cast<std::uint8_t>(*start) != regex.regstart))
    return true;
  return regex.regmust != nullptr &&
         is_missing(regex.regmust, regex.regmlen, start, end);
}

// Clears the record and searches.  `previous` is the byte ahead of the
// subject, or k_at_start.
bool search(const zxRegex& regex, const char* start, const char* end,
            int previous);

// ---------------------------------------------------------------- fields --

// Where the field of the FIELD node that begins at `at` ends; null if none
// does.
const char* field_end(zxnode::Node node, const char* at, const char* end);

// -------------------------------------------------------------- scanning --

// The first byte from `at` on that is (not) in set `set` of the plan; `end` if
// there is none.  The last byte ahead of `end` that is in the set, or null.
const char* find_in(const zxRegexPlan& plan, unsigned set, const char* at,
                    const char* end);
const char* find_not_in(const zxRegexPlan& plan, unsigned set, const char* at,
                        const char* end);
const char* find_last_in(const zxRegexPlan& plan, unsigned set, const char* at,
                         const char* end);

}  // namespace zxregexe

#endif  // ZXREGEXE_IMPL_H
