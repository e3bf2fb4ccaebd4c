// patterns_std.cpp - std::regex as a side of bench_patterns.
#include <regex>

#include "patterns_side.h"
#include "patterns_sides.h"

namespace patterns {
namespace {

constexpr auto k_syntax = std::regex::ECMAScript | std::regex::optimize;

class Regex {
 public:
  explicit Regex(const Pattern& pattern) : regex(pattern.theirs, k_syntax) {}

  bool search(std::string_view text) {
    subject = text.data();
    return std::regex_search(subject, subject + text.size(), found, regex);
  }

  std::size_t lengths() const {
    std::ptrdiff_t sum = 0;
    for (const std::csub_match& group : found) sum += group.length();
    return static_cast<std::size_t>(sum);
  }

  Span span(int n) const {
    const std::csub_match& group = found[static_cast<std::size_t>(n)];
    if (!group.matched) return {-1, -1};
    return span_between(subject, group.first, group.second);
  }

 private:
  const std::regex regex;
  std::cmatch found;
  const char* subject = nullptr;
};

class Replacer {
 public:
  explicit Replacer(const Replacement& wanted)
      : replacement(wanted), regex(wanted.pattern.theirs, k_syntax) {}

  std::size_t run() {
    text =
        std::regex_replace(replacement.subject(), regex, replacement.dollars);
    return text.size();
  }

  std::string_view result() const { return text; }

 private:
  const Replacement& replacement;
  const std::regex regex;
  std::string text;
};

// It recurses for each byte of a repetition, which no stack bears over long
// subjects.
bool can_run(std::string_view benchmark) {
  return benchmark != "to_last" && benchmark != "loop";
}

}  // namespace

void add_std() { add_side<Regex, Replacer>("std", can_run); }

}  // namespace patterns
