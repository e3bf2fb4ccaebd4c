// text.h - what the sources of the program bench_text share: rows, their sides
// and what the sides work on.
//
// A row, WHAT, is an operation on each of k_inputs inputs, and a side carries
// it out in its own way.  The result is new each time: where it is text, a
// string is made and destroyed.
#ifndef BENCH_TEXT_H
#define BENCH_TEXT_H

#include <benchmark/benchmark.h>

#include <bit>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "zxstr.h"

namespace text {

// So many that no branch predictor learns their order by heart.
inline constexpr std::size_t k_inputs = 1024;

// ---- inputs, the same in each run

std::vector<std::string> make_names(unsigned seed);
std::vector<int> make_ints();
std::vector<double> make_doubles();
std::vector<std::string> make_lines();

// Names of 5 to 20 bytes, and others.
inline const std::vector<std::string>& names() {
  static const auto list = make_names(1);
  return list;
}
inline const std::vector<std::string>& other_names() {
  static const auto list = make_names(2);
  return list;
}

// Whole numbers of up to 7 digits, some of them negative.
inline const std::vector<int>& ints() {
  static const auto list = make_ints();
  return list;
}

// Numbers with up to 4 decimals and 9 digits, as decimal fields hold them.
inline const std::vector<double>& doubles() {
  static const auto list = make_doubles();
  return list;
}

// Physical text of 10 to 60 bytes in code page 862: Hebrew words, numbers,
// dates, amounts, Latin words, brackets.
inline const std::vector<std::string>& lines() {
  static const auto list = make_lines();
  return list;
}

// The same texts as strings of ours.
std::vector<zxStr> ours(const std::vector<std::string>& texts);

// ---- sides

// Whether a result is what it should be, given ours for the same input.
using Agrees = bool (*)(std::string_view ours, std::string_view theirs);
bool same(std::string_view ours, std::string_view theirs);
// But for the last digit: of a number half-way between two texts ours is the
// one away from zero, theirs the even one.
bool same_but_for_a_tie(std::string_view ours, std::string_view theirs);
// The same characters in any order, brackets exchanged or not.
bool same_characters(std::string_view ours, std::string_view theirs);

// A side as the comparison of results sees it.
struct Side {
  const char* what;
  const char* name;
  std::string (*result)(std::size_t input);
  Agrees agrees;
};
std::vector<Side>& sides();

inline std::string shown(const std::string& result) { return result; }
inline std::string shown(std::string_view result) {
  return std::string(result);
}
inline std::string shown(const zxStr& result) {
  return std::string(result.view());
}
inline std::string shown(std::int32_t result) { return std::to_string(result); }
inline std::string shown(double result) {
  return std::to_string(std::bit_cast<std::uint64_t>(result));
}

template <auto operation>
std::string shown_result(std::size_t input) {
  return shown(operation(input));
}

template <auto operation>
void time_operation(benchmark::State& state) {
  for (auto _ : state)
    for (std::size_t input = 0; input < k_inputs; ++input) {
      auto result = operation(input);
      benchmark::DoNotOptimize(result);
    }
  state.counters["operations"] = static_cast<double>(k_inputs);
}

// Registers a side of a row, whose operation takes the number of an input.
// The first side of a row is ours.
template <auto operation>
void add(const char* what, const char* name, Agrees agrees = same) {
  sides().push_back({what, name, shown_result<operation>, agrees});
  benchmark::RegisterBenchmark((std::string(what) + "/" + name).c_str(),
                               time_operation<operation>);
}

// The sides that are sources of their own.
void add_formats();
void add_fmt();
void add_hebrew();
void add_fribidi();
void add_numbers();

}  // namespace text

#endif  // BENCH_TEXT_H
