// zxstrm.h - patterns over strings: searching, the cache of compiled
// patterns, reading what the last match found.
//
//   if (match(line, "^`s*(`w+)`s*=(.*)$"))
//     set(group_text(1), group_text(2));
//
// The cache's key is the ADDRESS of a pattern's text, not its contents:
// patterns are nearly always literals, whose address is a free and exact key.
// Text that changes behind an address goes on running the old program until
// forget(); the forms that take a zxStr forget by themselves, and keep
// programs by contents in a cache of their own.  A length beside the pointer
// is no part of the key either.
//
// Process-wide state: the caches; the subject holder, a string that refers to
// the text of the last search, so that groups outlive the caller's string;
// the match record (zxregexe.h).  All is cleared at the end of the process.
//
// Searching a string shares it with the holder: the next change of the
// caller's string copies it.  Code that reads the groups at once and changes
// the string in a loop is better served by match_buf().
#ifndef ZXSTRM_H
#define ZXSTRM_H

#include <cstdint>

#include "zxregexe.h"
#include "zxstr.h"

// ------------------------------------------------------------- searching --

// Every pattern is text that ends with NUL; or a pointer and a length, -1
// for text that ends with NUL; or a string.  A bad pattern is message 1752
// or 1751 (see regcomp); a null pattern fails an assertion.

// Searches the subject; true if there is a match.
bool match(const zxStr& subject, const char* pattern);
bool match(const zxStr& subject, const char* pattern, std::int32_t length);
bool match(const zxStr& subject, const zxStr& pattern);

// The same without regard to the case of ASCII letters in the subject: they
// are folded to lower case, the pattern is not, so it is written in lower
// case.  Groups and fields are of the subject as it stands.
bool imatch(const zxStr& subject, const char* pattern);
bool imatch(const zxStr& subject, const char* pattern, std::int32_t length);
bool imatch(const zxStr& subject, const zxStr& pattern);

// Searches the bytes from start to end, which the caller keeps for as long
// as groups are read; the subject holder stays as it is.
bool match_buf(const char* pattern, const char* start, const char* end);
bool match_buf(const char* pattern, std::int32_t length, const char* start,
               const char* end);
bool match_buf(const zxStr& pattern, const char* start, const char* end);

// True if the pattern is valid; never fails.
bool check_pattern(const zxStr& pattern);

// -------------------------------------------------------- reading a match --

// Slot n of the match record, 0 to 11: the whole match, the groups, the text
// before and behind it.  An unset group is empty.  Another n fails an
// assertion and counts as unset.
zxStr group_text(std::int32_t n);
std::int32_t group_length(std::int32_t n);
void group_assign(std::int32_t n, zxStr& out);

// Field n of the pattern, 1 to 20: its text and its type letter (0 if it took
// no part in the match).  Another n fails an assertion.
zxStr field_text(std::int32_t n);
char field_type(std::int32_t n);

// The alternative that was taken in slot n, 0 to 11, from 0; -1 if the group
// has none.  Another n fails an assertion.
std::int32_t alternative(std::int32_t n);

// -------------------------------------------------------------- the cache --

// The compiled pattern of the text at that address.  It belongs to the cache
// and lasts until another pattern takes its slot.  Null if a failure was
// dropped.
const zxRegex* get_regex(const char* pattern, std::int32_t length = -1);

// Empties the slot of that address, if it is the address's, and frees its
// program.
void forget(const char* pattern);

// Frees all programs and clears the subject holder and the match record.
void flush_regex_cache();

// How often a pattern was found in the cache, how often it was not, and how
// often the cache was flushed.
struct zxRegexCounts {
  std::int32_t hits;
  std::int32_t misses;
  std::int32_t flushes;
};
const zxRegexCounts& regex_counts();

#endif  // ZXSTRM_H
