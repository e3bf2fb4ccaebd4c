// text.cpp - the program that times composing and reading of text beside its
// peers.  bench/groups/text.py runs it and says what is compared.
//
//   bench_text --check      compares the results of all sides with ours and
//                           says what differs; exit code 1 if any does
//   bench_text [OPTION...]  as Google Benchmark has them
//
// Benchmarks are named WHAT/SIDE.
#include "text.h"

#include <algorithm>
#include <cstdio>
#include <random>

#include "zxmainf.h"

std::uint32_t traits = k_trait_console | k_trait_executable;

namespace text {

// ---- inputs

namespace {

// Fills a list with what a function makes of random numbers.
template <class Value, class Make>
std::vector<Value> made(unsigned seed, Make make) {
  std::mt19937 random(seed);
  std::vector<Value> values;
  while (values.size() < k_inputs) values.push_back(make(random));
  return values;
}

std::string name(std::mt19937& random) {
  std::string result(5 + random() % 16, ' ');
  for (char& byte : result)
    byte = static_cast<char>("etaoinshrdlu cmf-pg.w"[random() % 21]);
  return result;
}

// A number with 1 to `most` digits, each count as likely.
int number_of_digits(std::mt19937& random, unsigned most) {
  unsigned limit = 10;
  for (auto digits = 1 + random() % most; digits > 1; --digits) limit *= 10;
  return static_cast<int>(random() % limit);
}

}  // namespace

std::vector<std::string> make_names(unsigned seed) {
  return made<std::string>(seed, name);
}

std::vector<int> make_ints() {
  return made<int>(3, [](std::mt19937& random) {
    const int number = number_of_digits(random, 7);
    return random() % 8 == 0 ? -number : number;
  });
}

std::vector<double> make_doubles() {
  return made<double>(4, [](std::mt19937& random) {
    constexpr double k_powers[] = {1, 10, 100, 1000, 10000};
    const double number = number_of_digits(random, 9);
    const double value = number / k_powers[random() % std::size(k_powers)];
    return random() % 8 == 0 ? -value : value;
  });
}

std::vector<zxStr> ours(const std::vector<std::string>& texts) {
  std::vector<zxStr> strings;
  for (const std::string& text : texts) strings.emplace_back(text);
  return strings;
}

// ---- the comparison of results

std::vector<Side>& sides() {
  static std::vector<Side> all;
  return all;
}

bool same(std::string_view ours, std::string_view theirs) {
  return ours == theirs;
}

bool same_but_for_a_tie(std::string_view ours, std::string_view theirs) {
  return ours.size() == theirs.size() &&
         ours.substr(0, ours.size() - 1) == theirs.substr(0, ours.size() - 1);
}

bool same_characters(std::string_view ours, std::string_view theirs) {
  const auto sorted = [](std::string_view text) {
    std::string bytes(text);
    std::replace(bytes.begin(), bytes.end(), ')', '(');
    std::sort(bytes.begin(), bytes.end());
    return bytes;
  };
  return sorted(ours) == sorted(theirs);
}

namespace {

const Side& ours_of(std::string_view what) {
  return *std::find_if(sides().begin(), sides().end(),
                       [&](const Side& side) { return side.what == what; });
}

// How many inputs of a side have another result than ours; the first is
// shown.
int differences(const Side& side) {
  const Side& first = ours_of(side.what);
  int count = 0;
  for (std::size_t input = 0; input < k_inputs; ++input) {
    const std::string ours = first.result(input);
    const std::string theirs = side.result(input);
    if (side.agrees(ours, theirs) || ++count > 1) continue;
    std::printf("%s: ours \"%s\", %s \"%s\"\n", side.what, ours.c_str(),
                side.name, theirs.c_str());
  }
  if (count > 0)
    std::printf("%s: %d of %zu differ from %s\n", side.what, count, k_inputs,
                side.name);
  return count;
}

int check() {
  int count = 0;
  for (const Side& side : sides()) count += differences(side);
  return count;
}

void add_sides() {
  add_formats();
  add_hebrew();
  add_numbers();
#ifdef BENCH_WITH_FMT
  add_fmt();
#endif
#ifdef BENCH_WITH_FRIBIDI
  add_fribidi();
#endif
}

}  // namespace
}  // namespace text

int main(int argc, char** argv) {
  init_zxlib_args(1, argv);
  text::add_sides();
  if (argc == 2 && argv[1] == std::string_view("--check"))
    return text::check() == 0 ? 0 : 1;
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
