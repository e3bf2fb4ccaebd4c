// patterns_boost.cpp - Boost.Regex as a side of bench_patterns.
#ifdef BENCH_WITH_BOOST

#include <boost/regex.hpp>

#include "patterns_side.h"
#include "patterns_sides.h"

namespace patterns {
namespace {

// "^" and "$" are the ends of the subject, not of its lines.
const auto k_flags = boost::match_default | boost::match_single_line;

class Regex {
 public:
  explicit Regex(const Pattern& pattern) : regex(pattern.theirs) {}

  bool search(std::string_view text) {
    subject = text.data();
    return boost::regex_search(subject, subject + text.size(), found, regex,
                               k_flags);
  }

  std::size_t lengths() const {
    std::ptrdiff_t sum = 0;
    for (const boost::csub_match& group : found) sum += group.length();
    return static_cast<std::size_t>(sum);
  }

  Span span(int n) const {
    const boost::csub_match& group = found[n];
    if (!group.matched) return {-1, -1};
    return span_between(subject, group.first, group.second);
  }

 private:
  const boost::regex regex;
  boost::cmatch found;
  const char* subject = nullptr;
};

class Replacer {
 public:
  explicit Replacer(const Replacement& wanted)
      : replacement(wanted), regex(wanted.pattern.theirs) {}

  std::size_t run() {
    text = boost::regex_replace(replacement.subject(), regex,
                                replacement.dollars, k_flags);
    return text.size();
  }

  std::string_view result() const { return text; }

 private:
  const Replacement& replacement;
  const boost::regex regex;
  std::string text;
};

// It gives up on these, by an exception.
bool can_run(std::string_view benchmark) { return benchmark != "ambiguous"; }

}  // namespace

void add_boost() { add_side<Regex, Replacer>("boost", can_run); }

}  // namespace patterns

#endif  // BENCH_WITH_BOOST
