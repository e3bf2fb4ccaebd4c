// patterns_side.h - the benchmarks of one side of bench_patterns.
//
// A side is a class Regex, made of a Pattern, which is to compile it, with
//
//   bool search(std::string_view subject)   the first match
//   std::size_t lengths() const             of the match and all its groups,
//                                           each read, summed up
//   Span span(int group) const              after a match
//
// and a class Replacer, made of a Replacement, with
//
//   std::size_t run()                       replaces all; the result's length
//   std::string_view result() const
#ifndef BENCH_PATTERNS_SIDE_H
#define BENCH_PATTERNS_SIDE_H

#include <benchmark/benchmark.h>

#include <cstddef>
#include <string>
#include <string_view>

#include "patterns.h"

namespace patterns {

inline void count_operations(benchmark::State& state, std::size_t count) {
  state.counters["operations"] = static_cast<double>(count);
}

// ---- what is timed

template <class Regex>
void time_short(benchmark::State& state, const Short& row) {
  Regex regex(row.pattern);
  std::vector<std::string_view> subjects;
  for (const std::size_t visit : visits())
    subjects.emplace_back(row.subjects[visit]);
  for (auto _ : state) {
    std::size_t sum = 0;
    for (const std::string_view subject : subjects)
      if (regex.search(subject)) sum += regex.lengths();
    benchmark::DoNotOptimize(sum);
  }
  count_operations(state, subjects.size());
}

template <class Regex>
void time_search(benchmark::State& state, const Search& row) {
  Regex regex(row.pattern);
  std::string_view subject = row.subject();
  for (auto _ : state) {
    benchmark::DoNotOptimize(subject);
    std::size_t sum = 0;
    if (regex.search(subject)) sum = regex.lengths();
    benchmark::DoNotOptimize(sum);
  }
}

template <class Replacer>
void time_replacing(benchmark::State& state, const Replacement& row) {
  Replacer replacer(row);
  for (auto _ : state) benchmark::DoNotOptimize(replacer.run());
}

template <class Regex>
void time_compiling(benchmark::State& state) {
  for (auto _ : state)
    for (const Short& row : short_patterns()) {
      Regex regex(row.pattern);
      benchmark::DoNotOptimize(&regex);
    }
  count_operations(state, short_patterns().size());
}

// ---- what is compared

template <class Regex>
Spans spans_of(const Pattern& pattern, std::string_view subject) {
  Regex regex(pattern);
  Spans spans;
  if (!regex.search(subject)) return spans;
  for (int group = 0; group <= pattern.groups; ++group)
    spans.push_back(regex.span(group));
  return spans;
}

template <class Replacer>
std::string replaced_by(const Replacement& replacement) {
  Replacer replacer(replacement);
  replacer.run();
  return std::string(replacer.result());
}

// The span of a group between two places of the subject, null if unset.
inline Span span_between(const char* subject, const char* start,
                         const char* end) {
  if (start == nullptr || end == nullptr) return {-1, -1};
  return {start - subject, end - subject};
}

// ---- registering

inline bool can_run_all(std::string_view) { return true; }

// Registers WHAT/name for each benchmark that the side can run.
template <class Regex, class Replacer>
void add_side(const char* name,
              bool (*can_run)(std::string_view benchmark) = can_run_all) {
  sides().push_back({name, spans_of<Regex>, replaced_by<Replacer>, can_run});
  const auto add = [&](const char* what, auto function, auto&... row) {
    if (can_run(what))
      benchmark::RegisterBenchmark(
          (std::string(what) + "/" + name).c_str(),
          [function, &row...](benchmark::State& state) {
            function(state, row...);
          });
  };
  for (const Short& row : short_patterns())
    add(row.name, time_short<Regex>, row);
  for (const Search& row : searches()) add(row.name, time_search<Regex>, row);
  for (const Replacement& row : replacements())
    add(row.name, time_replacing<Replacer>, row);
  add("compile", time_compiling<Regex>);
}

}  // namespace patterns

#endif  // BENCH_PATTERNS_SIDE_H
