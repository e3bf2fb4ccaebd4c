// patterns.cpp - the program that times the pattern engine beside its peers.
// bench/groups/patterns.py runs it and says what is compared.
//
//   bench_patterns --check      compares the results of all sides with ours
//                               and says what differs; exit code 1 if any does
//   bench_patterns [OPTION...]  as Google Benchmark has them
//
// Benchmarks are named WHAT/SIDE.  patterns_subjects.cpp and
// patterns_long.cpp hold what is run, patterns_SIDE.cpp the sides.
#include "patterns.h"

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstdio>
#include <string_view>

#include "patterns_sides.h"
#include "zxmainf.h"

std::uint32_t traits = k_trait_console | k_trait_executable;

namespace patterns {

std::vector<Side>& sides() {
  static std::vector<Side> all;
  return all;
}

namespace {

void add_sides() {
  add_ours();
#ifdef BENCH_WITH_PCRE2
  add_pcre2();
#endif
#ifdef BENCH_WITH_RE2
  add_re2();
#endif
  add_std();
#ifdef BENCH_WITH_BOOST
  add_boost();
#endif
}

// ---- the comparison of results

void show(const Spans& spans) {
  if (spans.empty()) std::printf(" no match");
  for (const auto& [start, end] : spans) std::printf(" %td-%td", start, end);
}

class Comparison {
 public:
  void compare(const char* name, const Pattern& pattern,
               std::string_view subject) {
    const Spans ours = sides().front().spans(pattern, subject);
    for (const Side& side : sides()) {
      if (!side.can_run(name)) continue;
      const Spans theirs = side.spans(pattern, subject);
      if (theirs == ours) continue;
      std::printf("%s: \"%.100s\": ours", name, subject.data());
      show(ours);
      std::printf(", %s", side.name);
      show(theirs);
      std::printf("\n");
      ++differences;
    }
  }

  void compare(const Replacement& replacement) {
    const std::string ours = sides().front().replaced(replacement);
    for (const Side& side : sides()) {
      if (!side.can_run(replacement.name)) continue;
      if (side.replaced(replacement) == ours) continue;
      std::printf("%s: %s gives another text\n", replacement.name, side.name);
      ++differences;
    }
  }

  int differences = 0;
};

// A row whose subjects all match, or none, or whose subjects are of the wrong
// length, would not measure what it says.
int misfits() {
  int count = 0;
  for (const Short& row : short_patterns()) {
    std::size_t matches = 0;
    std::size_t odd_lengths = 0;
    for (const std::string& subject : row.subjects) {
      matches += !sides().front().spans(row.pattern, subject).empty();
      odd_lengths += subject.size() < 10 || subject.size() > 100;
    }
    const bool fits = row.subjects.size() == k_subjects && odd_lengths == 0 &&
                      matches >= k_subjects / 2 &&
                      matches <= k_subjects - k_subjects / 8;
    if (fits) continue;
    std::printf("%s: %zu subjects, %zu match, %zu of a wrong length\n",
                row.name, row.subjects.size(), matches, odd_lengths);
    ++count;
  }
  return count;
}

int check() {
  Comparison comparison;
  for (const Short& row : short_patterns())
    for (const std::string& subject : row.subjects)
      comparison.compare(row.name, row.pattern, subject);
  for (const Search& row : searches())
    comparison.compare(row.name, row.pattern, row.subject());
  for (const Replacement& row : replacements()) comparison.compare(row);
  return comparison.differences + misfits();
}

}  // namespace
}  // namespace patterns

int main(int argc, char** argv) {
  init_zxlib_args(1, argv);
  patterns::add_sides();
  if (argc == 2 && argv[1] == std::string_view("--check"))
    return patterns::check() == 0 ? 0 : 1;
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
