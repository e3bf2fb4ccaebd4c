// patterns_ours.cpp - our side of bench_patterns, with patterns compiled
// ahead as all peers have them, and once more through the cache of the
// string level.
#include "patterns_side.h"
#include "patterns_sides.h"
#include "zxregexc.h"
#include "zxregexe.h"
#include "zxstrm.h"
#include "zxstrm2.h"

namespace patterns {
namespace {

using benchmark::State;

class Regex {
 public:
  explicit Regex(const Pattern& pattern)
      : groups(pattern.groups),
        program(regcomp(pattern.ours,
                        pattern.ours + std::string_view(pattern.ours).size())) {
  }
  Regex(const Regex&) = delete;
  Regex& operator=(const Regex&) = delete;
  ~Regex() { zx_realloc(program, 0); }

  bool search(std::string_view text) {
    subject = text.data();
    return regexec(program, subject, subject + text.size());
  }

  std::size_t lengths() const {
    std::ptrdiff_t sum = 0;
    for (int n = 0; n <= groups; ++n)
      sum += zx_match.end[n] - zx_match.start[n];
    return static_cast<std::size_t>(sum);
  }

  Span span(int n) const {
    return span_between(subject, zx_match.start[n], zx_match.end[n]);
  }

 private:
  const int groups;
  zxRegex* const program;
  const char* subject = nullptr;
};

class Replacer {
 public:
  explicit Replacer(const Replacement& wanted)
      : replacement(wanted), subject(std::string_view(wanted.subject())) {}

  std::size_t run() {
    text = subject;
    replace_all(text, replacement.pattern.ours, replacement.ours);
    return static_cast<std::size_t>(text.length());
  }

  std::string_view result() const { return text.view(); }

 private:
  const Replacement& replacement;
  const zxStr subject;
  zxStr text;
};

// Strings, a pattern that is a literal, and the groups read one by one.
void time_strings(State& state, const Short& row) {
  std::vector<zxStr> subjects;
  for (const std::string& subject : row.subjects)
    subjects.emplace_back(std::string_view(subject));
  const char* const literal = row.pattern.ours;
  for (auto _ : state) {
    std::int32_t sum = 0;
    for (const std::size_t visit : visits())
      if (match(subjects[visit], literal))
        for (int n = 0; n <= row.pattern.groups; ++n) sum += group_length(n);
    benchmark::DoNotOptimize(sum);
  }
  count_operations(state, visits().size());
}

}  // namespace

void add_ours() {
  add_side<Regex, Replacer>("ours");
  for (const Short& row : short_patterns())
    benchmark::RegisterBenchmark(
        (std::string(row.name) + "/string").c_str(),
        [&row](State& state) { time_strings(state, row); });
}

}  // namespace patterns
