// zxregexc_exhaustive_test.cpp - every short pattern of a small alphabet:
// whether the compiler takes it, against two other readings of the grammar,
// and whether what it makes is sound.
// Tests zxlib/zxregexc.h and its sources.
#include <gtest/gtest.h>

#include <cstddef>
#include <string>
#include <string_view>

#include "kit/failure.h"
#include "regex_tree.h"
#include "zxregexc.h"

namespace {

// ---- a recogniser that rewrites
//
// The pattern is turned into a text of one letter for each token, which is
// then made shorter by rules until nothing is left that a rule fits:
//
//   S  an atom that is one byte             * + ?  themselves
//   W  another atom that has width          c      a counted quantifier
//   E  an atom that can match empty         ( )    of a capturing group
//   w  a piece that has width               < >    of a plain group
//   e  a piece that can match empty         |      itself
//
// It knows the alphabet of these tests only.

constexpr std::string_view k_alphabet = "ab.*+?|()[]^${}2,";

// The length of a counted quantifier at the start of a text; 0 if there is
// none.  One whose minimum is above its maximum is reported as well.
std::size_t count_length(std::string_view text, bool& is_in_order) {
  const std::size_t close = text.find('}');
  if (close == text.npos || !text.starts_with('{')) return 0;
  const std::string_view inner = text.substr(1, close - 1);
  if (inner.find_first_not_of("2,") != inner.npos) return 0;
  if (!inner.starts_with('2')) return 0;
  const std::size_t comma = inner.find(',');
  if (comma == inner.npos) return close + 1;
  const std::string_view most = inner.substr(comma + 1);
  if (most.find(',') != most.npos) return 0;
  // All digits are alike: the longer number is the larger one.
  is_in_order = most.empty() || most.size() >= comma;
  return close + 1;
}

// The length of a class at the start of a text; 0 if it is not closed.
std::size_t class_length(std::string_view text) {
  const std::size_t first = text.starts_with("[^") ? 2 : 1;
  const std::size_t close = text.find(']', first + 1);
  return close == text.npos ? 0 : close + 1;
}

// The tokens of a pattern; "!" is one that no rule takes.
std::string tokens_of(std::string_view rest) {
  std::string tokens;
  int open_braces = 0;
  while (!rest.empty()) {
    std::size_t length = 1;
    bool is_in_order = true;
    if (rest.starts_with("{{")) {
      tokens += '<';
      length = 2;
    } else if (rest.starts_with("}}")) {
      tokens += '>';
      length = 2;
    } else if (const std::size_t count = count_length(rest, is_in_order)) {
      tokens += is_in_order ? 'c' : '!';
      length = count;
    } else if (rest[0] == '[') {
      length = class_length(rest);
      if (length == 0) return "!";
      tokens += 'S';
    } else if (rest[0] == '}') {
      tokens += open_braces-- > 0 ? 'S' : '!';
    } else if (rest[0] == '^' || rest[0] == '$') {
      tokens += 'E';
    } else if (std::string_view("*+?|()").find(rest[0]) != rest.npos) {
      tokens += rest[0];
    } else {
      if (rest[0] == '{') ++open_braces;
      tokens += 'S';
    }
    rest.remove_prefix(length);
  }
  return tokens;
}

constexpr bool is_atom(char token) {
  return token == 'S' || token == 'W' || token == 'E';
}
constexpr bool is_quantifier(char token) {
  return token == '*' || token == '+' || token == '?' || token == 'c';
}

// The piece that an atom and its quantifier make; "!" if they make none.
char piece_of(char atom, char quantifier) {
  if (quantifier == '?') return 'e';
  if (atom == 'E' || (quantifier == 'c' && atom != 'S')) return '!';
  return quantifier == '*' ? 'e' : 'w';
}

// Turns all atoms and quantifiers into pieces.
std::string pieces_of(std::string_view tokens) {
  std::string pieces;
  for (std::size_t i = 0; i < tokens.size(); ++i) {
    const char atom = tokens[i];
    if (!is_atom(atom)) {
      pieces += is_quantifier(atom) ? '!' : atom;
      continue;
    }
    const char next = i + 1 < tokens.size() ? tokens[i + 1] : '\0';
    if (!is_quantifier(next)) {
      pieces += atom == 'E' ? 'e' : 'w';
      continue;
    }
    pieces += piece_of(atom, next);
    ++i;
    const bool may_be_lazy = atom == 'S' && next != '?';
    if (may_be_lazy && i + 1 < tokens.size() && tokens[i + 1] == '?') ++i;
  }
  return pieces;
}

// What a group with these tokens, of which none is a group, is as an atom.
char group_of(std::string_view tokens) {
  const std::string pieces = pieces_of(tokens) + "|";
  if (pieces.find('!') != pieces.npos) return '!';
  bool has_width = false;
  for (const char piece : pieces) {
    if (piece == '|' && !has_width) return 'E';
    has_width = piece != '|' && (has_width || piece == 'w');
  }
  return 'W';
}

// Whether the grammar has the pattern.
bool is_pattern(std::string_view pattern) {
  std::string tokens = tokens_of(pattern);
  while (true) {
    const std::size_t close = tokens.find_first_of(")>");
    if (close == tokens.npos) break;
    const std::size_t open = tokens.find_last_of("(<", close);
    if (open == tokens.npos) return false;
    if ((tokens[open] == '(') != (tokens[close] == ')')) return false;
    const auto inner =
        std::string_view(tokens).substr(open + 1, close - open - 1);
    tokens.replace(open, close - open + 1, 1, group_of(inner));
  }
  return tokens.find_first_of("(<!") == tokens.npos && group_of(tokens) != '!';
}

TEST(zxregexc_exhaustive, the_recogniser_knows_these_patterns) {
  for (const char* pattern :
       {"",       "a",     "a*?",  "a{2}",   "a{2}?", "a{2,}b", "a{2",
        "a{a}",   "a{,2}", "[]a]", "[^]]",   "[[]",   "()",     "(|a)",
        "{{a}}",  "(a*)?", "^?",   "{a}",    "{",     "a{,}",   "{{{a}}}",
        "(a|b)+", "]",     "a||b", "a{2,2}", "[a{]"})
    EXPECT_TRUE(is_pattern(pattern)) << pattern;
  for (const char* pattern :
       {"*",     "a**",     "a+?*",  "(a*)*", "(^)+", "(ab)*?", "(ab){2}",
        "{2}",   "a}",      "}}",    "{{a}",  "(a}}", "{{a)",   ")",
        "(",     "[",       "[]",    "[^]",   "^*",   "a??",    "a{22,2}",
        "(a|)+", "a{2}{2}", "a?{2}", "}",     "{a}}", "()+",    "|*"})
    EXPECT_FALSE(is_pattern(pattern)) << pattern;
}

// ---- all patterns

bool is_compiled(const std::string& pattern, bool& is_sound) {
  zxRegex* regex = regcomp(pattern.data(), pattern.data() + pattern.size());
  if (regex == nullptr) return false;
  is_sound = regex_is_sound(*regex);
  zx_realloc(regex, 0);
  return true;
}

// True if all agree on the pattern.
bool agrees(const std::string& pattern) {
  const bool expected = is_pattern(pattern);
  const bool is_parsed = regex_model::parse(pattern) != nullptr;
  const bool is_checked =
      regcheck(pattern.data(), pattern.data() + pattern.size());
  bool is_sound = true;
  const bool is_made = is_compiled(pattern, is_sound);
  if (is_parsed == expected && is_checked == expected && is_made == expected &&
      is_sound)
    return true;
  ADD_FAILURE() << "'" << pattern << "': the recogniser says " << expected
                << ", the model " << is_parsed << ", regcheck " << is_checked
                << ", regcomp " << is_made << ", sound " << is_sound;
  return false;
}

// Compares all patterns of a length; how many are valid.
int compare_all(std::size_t length) {
  std::size_t count = 1;
  for (std::size_t i = 0; i < length; ++i) count *= k_alphabet.size();
  int valid = 0;
  int faults = 0;
  // What is refused fails, and these failures are dropped.
  kit::with_failures_dropped([&] {
    for (std::size_t number = 0; number < count && faults < 10; ++number) {
      std::string pattern;
      std::size_t rest = number;
      for (std::size_t i = 0; i < length; ++i, rest /= k_alphabet.size())
        pattern += k_alphabet[rest % k_alphabet.size()];
      faults += !agrees(pattern);
      valid += is_pattern(pattern);
    }
  });
  return valid;
}

TEST(zxregexc_exhaustive, all_patterns_of_up_to_four_bytes) {
  EXPECT_EQ(compare_all(0), 1);
  // All but * + ? ( ) [ }, a class without its end included.
  EXPECT_EQ(compare_all(1), 10);
  EXPECT_GT(compare_all(2), 100);
  EXPECT_GT(compare_all(3), 1000);
  EXPECT_GT(compare_all(4), 10'000);
}

TEST(zxregexc_exhaustive_slow, all_patterns_of_five_bytes) {
  EXPECT_GT(compare_all(5), 100'000);
}

}  // namespace
