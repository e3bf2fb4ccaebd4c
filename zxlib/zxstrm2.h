// zxstrm2.h - changing strings by patterns: replacing matches, cutting pieces
// off.
//
// A replacement is text in which
//
//   ` or \ and a digit     stands for the text of that group of the match
//                          (0: the whole), nothing if it is unset
//   ... and three digits   is the byte of that octal number
//   ... and a b f n r t    is bell, backspace, form feed, line feed, carriage
//                          return, tab
//   ... and another byte   is that byte
//   |                      separates alternatives, as many as the pattern has
//                          at its top level: the one of the alternative that
//                          matched is taken.  Where the pattern made no such
//                          choice (alternative(0) is -1), it is a plain byte
//
// Matches behind the first never match "^", and see the byte ahead of them
// for word boundaries.  Patterns are given, cached and fail as in zxstrm.h;
// where a replacement comes with its length, both lengths are 0 or more.
#ifndef ZXSTRM2_H
#define ZXSTRM2_H

#include <cstdint>

#include "zxstrm.h"

// ------------------------------------------------------------- replacing --

// Replaces the first match; true if there was one.
bool replace1(zxStr& subject, const char* pattern, const char* replacement);
bool replace1(zxStr& subject, const char* pattern, std::int32_t pattern_length,
              const char* replacement, std::int32_t replacement_length);
bool replace1(zxStr& subject, const zxStr& pattern, const zxStr& replacement);

// Replaces all matches; true if there was one.
bool replace_all(zxStr& subject, const char* pattern, const char* replacement);
bool replace_all(zxStr& subject, const char* pattern,
                 std::int32_t pattern_length, const char* replacement,
                 std::int32_t replacement_length);
bool replace_all(zxStr& subject, const zxStr& pattern,
                 const zxStr& replacement);

// Replaces matches from left to right and returns how many; `count` is how
// often at most the subject is searched: behind each match, and once more
// where an empty match stands at the very place that the search began, in
// which case the byte there is passed over.  Null texts, negative lengths and
// a count below 1 fail an assertion (0, if that was dropped).
std::int32_t replace_n(zxStr& subject, const char* pattern,
                       std::int32_t pattern_length, const char* replacement,
                       std::int32_t replacement_length, std::int32_t count);

// --------------------------------------------------------------- cutting --

// Moves what stands before the first match from `subject` to `piece` and
// removes the match; without a match all of it is moved.  An empty match at
// the very start does not count, the search goes on behind the first byte.
// False, and an empty piece, if the subject is empty.
bool cut_first(zxStr& subject, zxStr& piece, const char* pattern);
bool cut_first(zxStr& subject, zxStr& piece, const char* pattern,
               std::int32_t length);
bool cut_first(zxStr& subject, zxStr& piece, const zxStr& pattern);

// The same until a piece that is not empty comes; false if none does.
bool cut_next(zxStr& subject, zxStr& piece, const char* pattern);
bool cut_next(zxStr& subject, zxStr& piece, const char* pattern,
              std::int32_t length);
bool cut_next(zxStr& subject, zxStr& piece, const zxStr& pattern);

#endif  // ZXSTRM2_H
