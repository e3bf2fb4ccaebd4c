// zxregexe_model_test.cpp - the pattern engine against a second one, which
// recurses over the pattern's tree (regex_model.h), on random patterns and
// subjects and on all short ones.  What is compared: whether a pattern is
// valid and a subject matches, the span, all groups, the texts before and
// behind, the counters of alternatives, all fields.
// Tests zxlib/zxregexe.h and zxregexc.h with their sources.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "regex_model.h"
#include "regex_random.h"
#include "zxregexc.h"
#include "zxregexe.h"

namespace {

using namespace regex_model;

// ---- the engine under test

// Bytes in a block of their very size: an access behind them is found.
class ExactBytes {
 public:
  explicit ExactBytes(std::string_view bytes)
      : size_(bytes.size()), block_(std::make_unique<char[]>(size_)) {
    std::copy(bytes.begin(), bytes.end(), block_.get());
  }
  const char* begin() const { return block_.get(); }
  const char* end() const { return block_.get() + size_; }

 private:
  std::size_t size_;
  std::unique_ptr<char[]> block_;
};

class Program {
 public:
  explicit Program(std::string_view pattern) {
    const ExactBytes bytes(pattern);
    regex_ = regcomp(bytes.begin(), bytes.end());
  }
  ~Program() { zx_realloc(regex_, 0); }
  Program(const Program&) = delete;
  Program& operator=(const Program&) = delete;

  const zxRegex* get() const { return regex_; }

 private:
  zxRegex* regex_;
};

bool is_valid(std::string_view pattern) {
  const ExactBytes bytes(pattern);
  return regcheck(bytes.begin(), bytes.end());
}

Span span_of(const char* subject, const char* start, const char* end) {
  const auto offset = [subject](const char* p) {
    return p ? static_cast<int>(p - subject) : k_unset;
  };
  return {offset(start), offset(end)};
}

Outcome outcome_of_match(const char* subject) {
  Outcome out;
  out.matched = true;
  for (std::size_t n = 0; n < out.groups.size(); ++n) {
    out.groups[n] = span_of(subject, zx_match.start[n], zx_match.end[n]);
    const bool counts = n == 0 || (n <= k_max_groups && zx_match.start[n]);
    if (counts) out.counters[n] = zx_match.alternative[n];
  }
  for (std::size_t n = 0; n < out.fields.size(); ++n) {
    const zxMatch::Field& field = zx_match.field[n];
    out.fields[n] = {field.type, span_of(subject, field.start, field.end)};
  }
  return out;
}

// A subject, and the byte ahead of it where it is the rest of a longer text.
struct Subject {
  std::string text;
  std::optional<char> before = {};
};

Outcome product_outcome(const Program& program, const Subject& subject) {
  const ExactBytes bytes(subject.text);
  const bool matched = subject.before
                           ? regexec_from(program.get(), bytes.begin(),
                                          bytes.end(), *subject.before)
                           : regexec(program.get(), bytes.begin(), bytes.end());
  return matched ? outcome_of_match(bytes.begin()) : Outcome{};
}

// ---- both

// What has been compared.
struct Tally {
  long pairs = 0;
  long matches = 0;
  long skipped = 0;         // the model found them too expensive
  long costly_matches = 0;  // with many steps behind them
  long valid_patterns = 0;
  long bad_patterns = 0;
  int differences = 0;
};

std::string shown(std::string_view bytes) {
  constexpr char k_digits[] = "0123456789abcdef";
  std::string text = "'";
  for (const char c : bytes) {
    const auto value = static_cast<unsigned char>(c);
    if (value >= 32 && value < 127)
      text += c;
    else
      text += {'<', k_digits[value / 16], k_digits[value % 16], '>'};
  }
  return text + "'";
}

std::string shown(const Span& span) {
  return std::to_string(span.start) + "-" + std::to_string(span.end);
}

std::string shown(const Outcome& out) {
  if (!out.matched) return "no match";
  std::string text;
  for (std::size_t n = 0; n < out.groups.size(); ++n) {
    if (out.groups[n].start == k_unset) continue;
    text += " " + std::to_string(n) + ":" + shown(out.groups[n]);
    if (out.counters[n]) text += "#" + std::to_string(out.counters[n]);
  }
  for (std::size_t n = 0; n < out.fields.size(); ++n)
    if (out.fields[n].type)
      text += " %" + std::to_string(n) + out.fields[n].type + ":" +
              shown(out.fields[n].span);
  return text;
}

// How the two differ; empty if they do not.
std::string difference(const Node& tree, const Program& program,
                       const Subject& subject, const Budget& budget,
                       Tally& tally) {
  Matcher model(tree, subject.text, budget);
  if (subject.before) model.go_on_behind(*subject.before);
  const auto expected = model.search();
  ++tally.pairs;
  if (!expected) {
    ++tally.skipped;
    return "";
  }
  tally.matches += expected->matched;
  tally.costly_matches += expected->matched && model.steps() > 3000;
  const Outcome got = product_outcome(program, subject);
  if (got == *expected) return "";
  return "\n  expected " + shown(*expected) + "\n  got      " + shown(got);
}

// The same for a pattern's text, which may be a bad one.
std::string difference(const std::string& pattern, const Subject& subject) {
  const Tree tree = parse(pattern);
  if (!tree || !is_valid(pattern)) return "";
  Tally tally;
  return difference(*tree, Program(pattern), subject, Budget{}, tally);
}

// Leaves out what the two differ without.
void shrink(std::string& pattern, Subject& subject) {
  const auto shorten = [&](std::string& text, std::size_t length) {
    for (std::size_t at = 0; at + length <= text.size();) {
      const std::string before = text;
      text.erase(at, length);
      if (!difference(pattern, subject).empty()) continue;
      text = before;
      ++at;
    }
  };
  for (int round = 0; round < 3; ++round)
    for (const std::size_t length : {8U, 4U, 3U, 2U, 1U}) {
      shorten(subject.text, length);
      shorten(pattern, length);
    }
}

void report(std::string pattern, Subject subject, const std::string& found) {
  const std::string before = pattern;
  std::string told = found;
  if (!difference(pattern, subject).empty()) {
    shrink(pattern, subject);
    told = difference(pattern, subject);
  }
  ADD_FAILURE() << "pattern " << shown(pattern) << " subject "
                << shown(subject.text) << " behind "
                << (subject.before ? shown(std::string(1, *subject.before))
                                   : "nothing")
                << told << "\n  found with " << shown(before);
}

// Compares a pattern on subjects that `next_subject` gives for its tree.
template <class NextSubject>
void compare(const std::string& pattern, int subjects, const Budget& budget,
             Tally& tally, NextSubject next_subject) {
  const Tree tree = parse(pattern);
  ++(tree ? tally.valid_patterns : tally.bad_patterns);
  if (is_valid(pattern) != (tree != nullptr)) {
    ADD_FAILURE() << "pattern " << shown(pattern)
                  << (tree ? " is valid" : " is not valid");
    ++tally.differences;
    return;
  }
  if (!tree) return;
  const Program program(pattern);
  EXPECT_TRUE(regex_is_sound(*program.get())) << shown(pattern);
  for (int i = 0; i < subjects; ++i) {
    const Subject subject = next_subject(*tree);
    const std::string found =
        difference(*tree, program, subject, budget, tally);
    if (found.empty()) continue;
    report(pattern, subject, found);
    ++tally.differences;
    return;
  }
}

// ---- the model by itself

struct Row {
  std::string_view pattern;
  std::string_view subject;
  const char* expected;
};

// Each slot as number, span and counter, unless that is 0.
TEST(zxregexe_model, the_model_gives_what_is_worked_out_by_hand) {
  constexpr Row k_rows[] = {
      {"", "b", " 0:0-0 10:0-0 11:0-1"},
      {"b", "abc", " 0:1-2 10:0-1 11:2-3"},
      {"a*", "baaa", " 0:0-0 10:0-0 11:0-4"},
      {"a*?b", "aab", " 0:0-3 10:0-0 11:3-3"},
      {"a|ab", "ab", " 0:0-1#1 10:0-0 11:1-2"},
      // The optional c counts in the group that was left last.
      {"(a|b)c?", "bc", " 0:0-2 1:0-1#1 10:0-0 11:2-2"},
      {"colou?r", "color", " 0:0-5#2 10:0-0 11:5-5"},
      // The optional b has counted to 2 when the second alternative comes.
      {"ab?c|ad", "ad", " 0:0-2#3 10:0-0 11:2-2"},
      // The second pass has counted to 2 in the group when the loop is left.
      {"(a|b)*c", "bc", " 0:0-2#1 1:0-1#3 10:0-0 11:2-2"},
      {"(a)|(b)", "b", " 0:0-1#2 2:0-1 10:0-0 11:1-1"},
      {"{{a|b}}c", "bc", " 0:0-2#2 10:0-0 11:2-2"},
      // The try at the first place has counted, the one that matches has not.
      {"(e|{{b|c}}d)f", "zef", " 0:1-3#2 1:1-2#1 10:0-1 11:3-3"},
      // The empty pass fails: the loop is left.
      {"{{a{0,2}}}+b", "b", " 0:0-1#2 10:0-0 11:1-1"},
      {"(a{0,2})*b", "aab", " 0:0-3#1 1:0-2#1 10:0-0 11:3-3"},
      {"(ab)`1", "abab", " 0:0-4 1:0-2 10:0-0 11:4-4"},
      {"{{(a`1?)b}}+", "abaab", " 0:0-2 1:0-1#3 10:0-0 11:2-5"},
      {"^%5d", "   42", " 0:0-5 10:0-0 11:5-5 %0d:0-5"},
      {"^%5d", "  42", "no match"},
      {"^%d$", "2147483648", "no match"},
      {"^%=d$", "2147483648", " 0:0-10 10:0-0 11:10-10 %0d:0-10"},
      {"^%x", "0x", " 0:0-1 10:0-0 11:1-2 %0x:0-1"},
      {"^%x$", "1fh", " 0:0-3 10:0-0 11:3-3 %0x:0-3"},
      {"^%v$", "-1.5k", " 0:0-5 10:0-0 11:5-5 %0v:0-5"},
      {"^%C$", "\"a\\\"\"", " 0:0-5 10:0-0 11:5-5 %0C:0-5"},
      {"^%t$", "29/02/2004", " 0:0-10 10:0-0 11:10-10 %0t:0-10"},
      {"^%t$", "29/02/2001", "no match"},
      {"^%t$", "1/1/60", "no match"},
      {"^%t", "1/2.99", "no match"},
  };
  for (const Row& row : k_rows) {
    const Tree tree = parse(row.pattern);
    ASSERT_TRUE(tree) << row.pattern;
    const auto outcome = Matcher(*tree, row.subject).search();
    ASSERT_TRUE(outcome) << row.pattern;
    EXPECT_EQ(shown(*outcome), row.expected)
        << row.pattern << " on " << row.subject;
  }
}

// ---- chosen pairs

struct Pair {
  std::string_view pattern;
  std::string_view subject;
};

void compare_pairs(std::initializer_list<Pair> pairs) {
  for (const Pair& pair : pairs) {
    const std::string pattern(pair.pattern);
    const Subject subject{std::string(pair.subject)};
    EXPECT_TRUE(is_valid(pattern)) << pattern;
    EXPECT_EQ(difference(pattern, subject), "")
        << pattern << " on " << subject.text;
  }
}

TEST(zxregexe_model, loops_with_empty_passes_end) {
  compare_pairs({{"{{a{0,2}}}+b", "/AAAbab"},
                 {"{{{{$a{0,2}}}+a|b}}", ""},
                 {"{{{{$a{0,2}}}+a|b}}", "x"},
                 {"D?{{{{$a{0}}}+a}}", ""}});
}

// A repetition that is left with fewer passes tries what follows each time:
// groups that open there begin to count anew, choices there count.
TEST(zxregexe_model, tries_that_fail_at_once_still_count) {
  compare_pairs({{"a{0,}{{b}}*bb|", "ab"},
                 {"{{ba{0,}}}*bb", "bbab"},
                 {"(a{0,}(b))*b", "bbab"},
                 {"(a{0,}(b))+b", "bbab"},
                 {"(ab*(c?))*d", "abcabd"},
                 {"{{(`dx*)(1{?2)}}*", "5x12 5x"},
                 {"{{{{{{ab{0,}}}}}+^}}?a", "aba"}});
}

// ---- random pairs

constexpr int k_most_differences = 4;

constexpr std::string_view k_pattern_noise =
    "aabb..**++??||(((())))[[]]^^$${{}}{}{2,}22,,--%%``\\\\019dxfvstCw\0\xe0"sv;

const Flavour& any_flavour(Random& random) {
  static constexpr const Flavour* k_flavours[] = {
      &k_all,        &k_all,         &k_nested,       &k_nested,
      &k_nested,     &k_plain,       &k_empty_passes, &k_empty_passes,
      &k_references, &k_with_fields, &k_with_fields,  &k_letters};
  return *k_flavours[random.below(std::size(k_flavours))];
}

std::string any_pattern(Random& random, const Flavour& flavour) {
  if (random.percent(4))
    return noise(random, random.between(0, 9), k_pattern_noise);
  std::string pattern = PatternWriter(random, flavour).pattern();
  if (random.percent(12))
    pattern = mutated(random, pattern, random.between(1, 2), k_pattern_noise);
  return pattern;
}

Subject any_subject(Random& random, const Flavour& flavour, const Node& tree) {
  // Some bytes stand in no pattern of the flavour.
  const std::string bytes = std::string(flavour.literals) + "z\n";
  SubjectWriter writer(random, flavour.literals);
  if (random.percent(20)) writer.repeat_at_most(8);
  if (flavour.depth <= 2 && random.percent(15)) writer.repeat_at_most(60);
  Subject subject{writer.subject(tree)};
  const int how = random.below(100);
  if (how < 35)
    subject.text.insert(0, noise(random, random.between(1, 6), bytes));
  if (how < 20 || (how > 35 && how < 50))
    subject.text += noise(random, random.between(1, 6), bytes);
  if (how > 45 && how < 70)
    subject.text = mutated(random, subject.text, random.between(1, 3), bytes);
  if (how > 92) subject.text = noise(random, random.between(0, 25), bytes);
  if (flavour.depth == 1 && random.percent(8))
    subject.text.insert(0, noise(random, random.between(50, 1500), bytes));
  if (random.percent(5)) subject.text += random.byte();
  if (random.percent(15))
    subject.before = random.percent(50) ? random.byte() : random.of(bytes);
  return subject;
}

Tally compare_random(unsigned seed, int patterns, int subjects) {
  Random random(seed);
  Tally tally;
  for (int i = 0; i < patterns; ++i) {
    const Flavour& flavour = any_flavour(random);
    compare(
        any_pattern(random, flavour), subjects, Budget{}, tally,
        [&](const Node& tree) { return any_subject(random, flavour, tree); });
    if (tally.differences >= k_most_differences) break;
  }
  return tally;
}

// ---- patterns that go back very often

constexpr Flavour k_ambiguous = {.literals = "aaab"sv,
                                 .depth = 1,
                                 .pieces = 2,
                                 .quantified = 35,
                                 .literal = 14,
                                 .byte_class = 0,
                                 .class_letter = 0,
                                 .any = 1,
                                 .group = 3,
                                 .plain_group = 3,
                                 .anchor = 0,
                                 .boundary = 0,
                                 .back_reference = 0,
                                 .field = 0};

// Writes patterns of which one part fits the same text in many ways and then
// fails, beside another that does not fail.
class HardPatternWriter {
 public:
  explicit HardPatternWriter(Random& random)
      : random_(random), writer_(random, k_ambiguous) {}

  std::string pattern() {
    const std::string hard = many_ways() + tail();
    switch (random_.below(5)) {
      case 0:
        return "^" + hard + "|" + rest();
      case 1:
        return "{{" + hard + "}}?" + rest();
      case 2:
        return "^(" + hard + "|" + rest() + ")";
      case 3:
        return "{{" + rest() + "|a}}{{" + hard + "|" + rest() + "}}";
      default:
        return "(" + hard + ")?" + rest();
    }
  }

 private:
  std::string many_ways() {
    switch (random_.below(4)) {
      case 0:
        return loop(body()) + loop(body());
      case 1:
        return stars();
      case 2:
        return loop(loop(body()) + any_of({"b", "a?", "", "c?", "[ab]"}));
      default:
        return loop(body());
    }
  }

  std::string body() {
    if (random_.percent(50)) return writer_.pattern();
    return any_of({"a|aa", "a|a", "a?b?|b", "a*b|a", "aa?|b?a", "a|ab?|b",
                   "a+|b", "a*?b", "(a)|aa", "{{a|b}}|a", "a+b?", "[ab]|a",
                   ".|a", "a{1,2}"});
  }

  std::string grouped(const std::string& text) {
    return random_.percent(50) ? "(" + text + ")" : "{{" + text + "}}";
  }

  std::string loop(const std::string& text) {
    return grouped(text) + random_.of("*+");
  }

  // Simple repetitions in a row.
  std::string stars() {
    std::string text;
    const int count = random_.between(3, 5);
    for (int i = 0; i < count; ++i) {
      const std::string star =
          any_of({".*", ".*?", "a*", "[ab]*", "a{0,3}", "a?", ".+", "`w*?"});
      text += random_.percent(50) ? grouped(star) : star;
    }
    return text;
  }

  std::string tail() {
    return any_of({"c", "$", "[cd]", "bbbc", "%t", "^", "{{c|dd}}", "`b`B"});
  }

  std::string rest() {
    if (random_.percent(40)) return writer_.pattern();
    return any_of(
        {"(a|b)*", "{{a|b}}+", "a", ".*", "(a|b|.)*$", "((a)|b)?", ""});
  }

  template <std::size_t N>
  std::string any_of(const std::string_view (&choices)[N]) {
    return std::string(random_.pick(choices));
  }

  Random& random_;
  PatternWriter writer_;
};

Subject hard_subject(Random& random) {
  std::string text = noise(random, random.between(4, 9), "aaaaaab");
  if (random.percent(40)) text += noise(random, random.between(1, 6), "a");
  if (random.percent(60)) text += random.of("bbcd");
  return {text};
}

Tally compare_hard(unsigned seed, int patterns, int subjects, long steps) {
  Random random(seed);
  Tally tally;
  const Budget budget{.steps = steps, .depth = 1500};
  for (int i = 0; i < patterns; ++i) {
    compare(HardPatternWriter(random).pattern(), subjects, budget, tally,
            [&](const Node&) { return hard_subject(random); });
    if (tally.differences >= k_most_differences) break;
  }
  return tally;
}

// The pairs are worth comparing: many match, few are too expensive.
void expect_useful(const Tally& tally) {
  EXPECT_GT(tally.matches, tally.pairs / 3) << "of " << tally.pairs;
  EXPECT_LT(tally.skipped, tally.pairs / 50) << "of " << tally.pairs;
  EXPECT_GT(tally.valid_patterns, tally.bad_patterns);
  EXPECT_GT(tally.bad_patterns, tally.valid_patterns / 50);
}

void expect_useful_and_hard(const Tally& tally) {
  EXPECT_GT(tally.costly_matches, tally.pairs / 20) << "of " << tally.pairs;
  EXPECT_LT(tally.skipped, tally.pairs / 25) << "of " << tally.pairs;
}

TEST(zxregexe_model, random_patterns_match_as_in_the_model) {
  expect_useful(compare_random(1, 6'000, 4));
}

TEST(zxregexe_model, patterns_that_go_back_often_match_as_in_the_model) {
  expect_useful_and_hard(compare_hard(2, 150, 4, 400'000));
}

TEST(zxregexe_model_slow, a_million_random_pairs_match_as_in_the_model) {
  const Tally tally = compare_random(3, 280'000, 4);
  expect_useful(tally);
  EXPECT_GT(tally.pairs, 1'000'000);
}

TEST(zxregexe_model_slow, many_patterns_that_go_back_often) {
  expect_useful_and_hard(compare_hard(4, 6'000, 4, 3'000'000));
}

// ---- all short pairs

using Pieces = std::vector<std::string_view>;

// Each byte of a text as a piece.
Pieces bytes_of(std::string_view text) {
  Pieces pieces;
  for (std::size_t i = 0; i < text.size(); ++i)
    pieces.push_back(text.substr(i, 1));
  return pieces;
}

// Calls `use` with all texts of up to `longest` pieces, until it gives false.
template <class Use>
bool with_all_texts(const Pieces& pieces, int longest, const std::string& start,
                    Use use) {
  if (!use(start)) return false;
  if (longest == 0) return true;
  for (const std::string_view piece : pieces)
    if (!with_all_texts(pieces, longest - 1, start + std::string(piece), use))
      return false;
  return true;
}

// All patterns of up to so many pieces on all subjects of up to so many bytes.
void compare_all(const Pieces& pieces, int longest_pattern,
                 std::string_view bytes, int longest_subject) {
  std::vector<std::string> subjects;
  with_all_texts(bytes_of(bytes), longest_subject, "",
                 [&](const std::string& text) {
                   subjects.push_back(text);
                   return true;
                 });
  Tally tally;
  with_all_texts(pieces, longest_pattern, "", [&](const std::string& pattern) {
    std::size_t i = 0;
    compare(pattern, static_cast<int>(subjects.size()), Budget{}, tally,
            [&](const Node&) { return Subject{subjects[i++]}; });
    return tally.differences < k_most_differences;
  });
  EXPECT_EQ(tally.skipped, 0);
  EXPECT_GT(tally.pairs, 10'000);
}

TEST(zxregexe_model, all_short_patterns_match_short_subjects_as_in_the_model) {
  compare_all(bytes_of("ab.*+?|()^$"), 4, "ab", 3);
}

TEST(zxregexe_model, all_short_patterns_with_empty_passes) {
  compare_all({"a{0,2}", "b", "(", "{{", ")", "}}", ")+", "}}*", "|"}, 4, "ab/",
              3);
}

TEST(zxregexe_model_slow, all_patterns_of_groups_and_loops) {
  compare_all(bytes_of("ab*?|()"), 7, "ab", 4);
}

TEST(zxregexe_model_slow, all_patterns_of_plain_groups) {
  compare_all(bytes_of("a{}|+?"), 8, "ab", 3);
}

TEST(zxregexe_model_slow, all_patterns_of_references_and_classes) {
  compare_all(bytes_of("a`1?*|()."), 6, "a1", 3);
}

TEST(zxregexe_model_slow, all_patterns_of_boundaries) {
  compare_all(bytes_of("a`bB+?|^$"), 5, "a -", 3);
}

TEST(zxregexe_model_slow, all_patterns_of_loops_with_empty_passes) {
  compare_all(
      {"a{0,2}", "b", "$", "(", "{{", ")", ")+", ")*", "}}+", "}}*", "|"}, 7,
      "ab/", 4);
}

}  // namespace
