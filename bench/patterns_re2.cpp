// patterns_re2.cpp - RE2 as a side of bench_patterns.
#ifdef BENCH_WITH_RE2

#include <re2/re2.h>

#include <array>

#include "patterns_side.h"
#include "patterns_sides.h"

namespace patterns {
namespace {

using re2::RE2;
using re2::StringPiece;

RE2::Options options() {
  RE2::Options chosen;
  chosen.set_encoding(RE2::Options::EncodingLatin1);
  chosen.set_dot_nl(true);
  return chosen;
}

class Regex {
 public:
  explicit Regex(const Pattern& pattern)
      : slots(pattern.groups + 1), regex(pattern.theirs, options()) {}

  bool search(std::string_view text) {
    subject = text.data();
    return regex.Match(StringPiece(text.data(), text.size()), 0, text.size(),
                       RE2::UNANCHORED, found.data(), slots);
  }

  std::size_t lengths() const {
    std::size_t sum = 0;
    for (int n = 0; n < slots; ++n) sum += at(n).size();
    return sum;
  }

  Span span(int n) const {
    return span_between(subject, at(n).data(), at(n).data() + at(n).size());
  }

 private:
  const StringPiece& at(int n) const {
    return found[static_cast<std::size_t>(n)];
  }

  const int slots;
  const RE2 regex;
  std::array<StringPiece, 10> found;
  const char* subject = nullptr;
};

// With backslashes instead of dollars.
std::string rewrite_of(std::string_view dollars) {
  std::string rewrite(dollars);
  for (char& byte : rewrite)
    if (byte == '$') byte = '\\';
  return rewrite;
}

class Replacer {
 public:
  explicit Replacer(const Replacement& replacement)
      : regex(replacement.pattern.theirs, options()),
        rewrite(rewrite_of(replacement.dollars)),
        subject(replacement.subject()) {}

  std::size_t run() {
    text = subject;
    RE2::GlobalReplace(&text, regex, rewrite);
    return text.size();
  }

  std::string_view result() const { return text; }

 private:
  const RE2 regex;
  const std::string rewrite;
  const std::string& subject;
  std::string text;
};

}  // namespace

void add_re2() { add_side<Regex, Replacer>("re2"); }

}  // namespace patterns

#endif  // BENCH_WITH_RE2
