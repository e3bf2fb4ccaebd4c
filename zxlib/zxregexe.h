// zxregexe.h - the pattern matcher: runs compiled patterns over bytes.
//
// A match is the first that the pattern's order of preference gives, at the
// first place of the subject where there is one: the left alternative ahead
// of the right one, as many repetitions as possible (as few, for the lazy
// forms).  All comparison is byte by byte; nothing is folded.
//
// The results stand in one process-wide record, zx_match, until the next
// run: callers read them at once.  Its pointers lead into the subject, which
// the caller keeps.
//
// Choices that a run may have to go back to are kept on a stack of the
// matcher's own, on the heap, of 16 bytes each (12 on 32 bits): one for a
// simple repetition however long, about four for each pass of a repeated
// group.  There is no other limit; when the memory is used up, the process
// ends with message 2000.  What a run needed beyond 64 KB is given back when
// the run ends.  A subject of 0x7FFFFFFF bytes and more fails an assertion.
//
// Patterns whose time would grow out of all proportion are cut short: when a
// run has gone back very often, the places that have failed are remembered,
// in tables of 64 MB at most.  This never changes a result.  It can't be done
// for patterns that refer back to groups, nor for those with a loop whose
// passes may be empty, as in "(a{0,2})*": these take their time, which doubles
// with each such loop inside another.
#ifndef ZXREGEXE_H
#define ZXREGEXE_H

#include <cstdint>

#include "zxregexc.h"

// What a run left.  A match that is rejected by the literal it must contain,
// or by its first byte behind "^", leaves the former results standing; every
// other run clears them first.  A run that finds nothing leaves no group and
// no field, but what its tries have counted.
struct zxMatch {
  static constexpr std::int32_t k_slots = 12;
  static constexpr std::int32_t k_before = 10;
  static constexpr std::int32_t k_after = 11;
  static constexpr std::int32_t k_fields = 20;

  // A typed field: its letter, 0 when unset, and its text.
  struct Field {
    char type;
    const char* start;
    const char* end;
  };

  // Slot 0 is the whole match, 1 to 9 the groups, 10 the text before the
  // match, 11 the text behind it.  Null when unset.
  const char* start[k_slots];
  const char* end[k_slots];

  // For each group that took part: which of its alternatives was taken, from
  // 1, or 0 if it has none.  Slot 0 stands for the top level and for {{ }}
  // groups together.  Optional and repeated groups count as alternatives of
  // the group they stand in, and a count is not put back when a try fails.
  std::int32_t alternative[k_slots];

  // By their order in the pattern, the first at 0.
  Field field[k_fields];
};

extern zxMatch zx_match;

// Searches the bytes from `subject` to `end`; true if there is a match.  A
// null program or subject is message 1753, one without its magic byte 1754;
// an end ahead of the subject fails an assertion.  False if that was dropped.
bool regexec(const zxRegex* regex, const char* subject, const char* end);

// The same on the rest of a longer text, to go on behind an earlier match:
// "^" never matches, and `prev_char` is the byte ahead of the subject for
// the word boundaries.
bool regexec_from(const zxRegex* regex, const char* subject, const char* end,
                  char prev_char);

// Empties the record: all groups and fields unset, all counters 0; and gives
// back the memory that runs keep for the next one.
void clear_match();

#endif  // ZXREGEXE_H
