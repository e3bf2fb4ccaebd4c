// zxregexc.h - the pattern compiler: turns the text of a pattern into a
// compact program of nodes, which zxregexe.h runs.
//
// The dialect is told in docs/patterns.md.  Patterns are byte strings with an
// explicit end; the backtick and the backslash escape alike, so that paths
// stay readable; "%" matches a whole typed field in one step.
//
// A program is one block of memory: this header, the nodes, and behind them
// the plan, which is what the matcher has worked out about the nodes ahead of
// all runs.  All is read only once it stands.
//
// A node is an opcode byte, a link of two bytes (highest first: the distance
// to the node that follows when this one has matched, 0 for none; that of
// BACK counts backward) and operands.  regex_dump() shows them.
//
//     magic  node             node           node
//   +------+-----------------+--------------+----------
//   | 156  | op | link | ... | op | link | . | op | ...
//   +------+-----------------+--------------+----------
//
// One compile at a time: the parser's state is process-wide.
#ifndef ZXREGEXC_H
#define ZXREGEXC_H

#include <cstddef>
#include <cstdint>

#include "zxstr.h"

struct zxRegexPlan;

// The first byte of every program.
inline constexpr std::uint8_t k_regex_magic = 156;

// regstart of a program whose matches may begin with different bytes.
inline constexpr std::uint8_t k_regex_no_start = 255;

// A pattern has at most this many capture groups.  Groups 10 and 11 are
// accepted and capture nothing; a twelfth is refused.
inline constexpr int k_regex_groups = 9;

// A pattern has at most this many fields.
inline constexpr int k_regex_fields = 19;

// A counted repetition has no maximum above this one, which stands for "and
// more".
inline constexpr int k_regex_max_count = 32767;

// A compiled pattern.  Freed with zx_realloc(regex, 0) by its owner.
struct zxRegex {
  std::uint8_t regstart;     // the first byte of any match, or 255: unknown
  std::uint8_t reganch;      // 0; 1: begins with ^; 2: ^ and then regstart
  std::uint16_t plan_place;  // of the plan, in units of 8 bytes from here
  std::uint32_t regmlen;     // length of regmust
  const char* regmust;       // a literal that any match contains, or null
  std::uint32_t size;        // of the program in bytes, the magic included
  std::int32_t holders;      // for the owner, who may share it; 1 at first
  std::uint8_t magic;        // 156; the program's first byte

  const std::uint8_t* program() const { return at(k_program_place); }
  const zxRegexPlan* plan() const {
    return reinterpret_cast<const zxRegexPlan*>(
        at(std::size_t{plan_place} * k_plan_unit));
  }

  static const std::size_t k_program_place;
  static constexpr std::size_t k_plan_unit = 8;

 private:
  const std::uint8_t* at(std::size_t place) const {
    return reinterpret_cast<const std::uint8_t*>(this) + place;
  }
};
inline constexpr std::size_t zxRegex::k_program_place =
    offsetof(zxRegex, magic);

// Compiles the bytes from `pattern` to `end`, NULs included, and returns a
// program that the caller owns.  A pattern that is not valid is message 1752
// with the pattern, a program of 32767 bytes and more message 1751; a null
// pattern, or an end ahead of it, fails an assertion.  Null is returned only
// when one of these was dropped.
zxRegex* regcomp(const char* pattern, const char* end);

// True if the pattern is valid, whatever its size.  A bad one is no failure;
// null pointers are, as above (false, if that was dropped).
bool regcheck(const char* pattern, const char* end);

// The program as text, for tests and for people: a line for the header,
// then a line for each node with its place in the program, its name, its
// operands and, behind "->", the place that its link leads to:
//
//   regstart 97 reganch 0 regmust ""
//   1 BRANCH -> 10
//   4 EXACTLY "a" -> 10
//   10 END
//
// Bytes of literals and classes that are not printable ASCII, and those that
// the notation needs itself, are shown as ` and three octal digits.
zxStr regex_dump(const zxRegex& regex);

// Walks the program and checks that each opcode exists, each operand and link
// lies within it and each node is one that its place allows.
bool regex_is_sound(const zxRegex& regex);

#endif  // ZXREGEXC_H
