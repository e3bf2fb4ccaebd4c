// patterns.h - what the sources of the program bench_patterns share: the
// patterns with their subjects, and the sides that run them.
//
// A side is an engine.  Its source registers it with add_side(), under the
// name that its benchmarks carry, as "item/pcre2"; a side whose package is
// missing is not compiled.  patterns_side.h holds what all sides have in
// common, so that they do the same work.
#ifndef BENCH_PATTERNS_H
#define BENCH_PATTERNS_H

#include <cstddef>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace patterns {

// ---- the patterns

// A pattern in our spelling and in the one that all peers share.  Both mean
// the same for all subjects here: bytes, of which "." takes every one, and "$"
// is the very end.
struct Pattern {
  const char* ours;
  const char* theirs;
  int groups;
};

// Matched against 32 short subjects.  All groups are read.
struct Short {
  const char* name;
  Pattern pattern;
  std::vector<std::string> subjects;
};
inline constexpr std::size_t k_subjects = 32;
const std::vector<Short>& short_patterns();

// The order in which the subjects are visited, long enough that it can't be
// learnt by heart; each subject comes equally often.
const std::vector<std::size_t>& visits();

// One search in one subject: a long one, or one that takes very long.
struct Search {
  const char* name;
  Pattern pattern;
  const std::string& (*subject)();
};
const std::vector<Search>& searches();

// All matches in a long subject are replaced.
struct Replacement {
  const char* name;
  Pattern pattern;
  const std::string& (*subject)();
  const char* ours;     // groups are `1 or \1
  const char* dollars;  // groups are $1
};
const std::vector<Replacement>& replacements();

// ---- the sides

// Where the whole match and the groups stand in the subject, -1 for an unset
// group.  Empty if there is no match.
using Span = std::pair<std::ptrdiff_t, std::ptrdiff_t>;
using Spans = std::vector<Span>;

// A side as the comparison of results sees it.
struct Side {
  const char* name;
  Spans (*spans)(const Pattern& pattern, std::string_view subject);
  std::string (*replaced)(const Replacement& replacement);
  bool (*can_run)(std::string_view benchmark);
};
std::vector<Side>& sides();

}  // namespace patterns

#endif  // BENCH_PATTERNS_H
