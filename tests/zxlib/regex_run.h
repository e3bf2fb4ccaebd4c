// regex_run.h - what the tests of the pattern engine share: programs that are
// given back, texts that end where memory ends, matches as text.
#ifndef TESTS_ZXLIB_REGEX_RUN_H
#define TESTS_ZXLIB_REGEX_RUN_H

#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>

#include "kit/target.h"
#include "zxmisc.h"
#include "zxregexc.h"
#include "zxregexe.h"

namespace regex_run {

// A copy of a text that lasts until the next one is made.  It ends where
// memory that can be read ends, and no NUL follows it.
inline std::string_view at_the_end_of_memory(std::string_view text) {
  constexpr std::size_t k_room = std::size_t{1} << 18;
  static const kit::GuardedMemory memory(k_room);
  EXPECT_LE(text.size(), k_room);
  char* start = memory.end() - text.size();
  if (!text.empty()) std::memcpy(start, text.data(), text.size());
  return {start, text.size()};
}

// A compiled pattern, compiled from such a copy.
class Program {
 public:
  explicit Program(std::string_view pattern) {
    const std::string_view text = at_the_end_of_memory(pattern);
    regex = regcomp(text.data(), text.data() + text.size());
  }
  Program(const Program&) = delete;
  Program& operator=(const Program&) = delete;
  ~Program() { zx_realloc(regex, 0); }

  zxRegex* get() const { return regex; }

 private:
  zxRegex* regex;
};

inline bool check(std::string_view pattern) {
  const std::string_view text = at_the_end_of_memory(pattern);
  return regcheck(text.data(), text.data() + text.size());
}

// A text as it would stand in a source, for messages of tests.
inline std::string shown(std::string_view text) {
  return testing::PrintToString(std::string(text.substr(0, 200)));
}

// The record of a match as text, places counted from the subject's start:
// "1-4 1:1-2 3:4-4" is a match of three bytes in which groups 1 and 3 took
// part.  Checks by the way that slots 10 and 11 are the rest of the subject.
inline std::string match_as_text(std::string_view subject) {
  const char* const start = subject.data();
  const zxMatch& found = zx_match;
  EXPECT_EQ(found.start[zxMatch::k_before], start);
  EXPECT_EQ(found.end[zxMatch::k_before], found.start[0]);
  EXPECT_EQ(found.start[zxMatch::k_after], found.end[0]);
  EXPECT_EQ(found.end[zxMatch::k_after], start + subject.size());
  const auto span = [&](int slot) {
    return std::to_string(found.start[slot] - start) + "-" +
           std::to_string(found.end[slot] - start);
  };
  std::string text = span(0);
  for (int slot = 1; slot <= k_regex_groups; ++slot) {
    if (found.start[slot] == nullptr || found.end[slot] == nullptr) continue;
    text += " " + std::to_string(slot) + ":" + span(slot);
  }
  return text;
}

// What a search finds: "no", or the match as text.
inline std::string search(const zxRegex* regex, std::string_view subject) {
  const std::string_view text = at_the_end_of_memory(subject);
  if (!regexec(regex, text.data(), text.data() + text.size())) return "no";
  return match_as_text(text);
}

inline std::string search(std::string_view pattern, std::string_view subject) {
  const Program program(pattern);
  return search(program.get(), subject);
}

}  // namespace regex_run

#endif  // TESTS_ZXLIB_REGEX_RUN_H
