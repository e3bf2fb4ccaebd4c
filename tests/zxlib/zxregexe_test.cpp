// zxregexe_test.cpp - the pattern matcher: order of search and preference,
// groups, counters, references, byte classes, repetitions, typed fields
// against tables and an obvious model, long and pathological subjects, what
// stands in the record behind each outcome.
// Tests zxlib/zxregexe.h and zxregexe*.cpp.
#include "zxregexe.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "regex_run.h"
#include "zxatsys.h"
#include "zxmisc.h"

namespace {

using kit::line_of;
using regex_run::at_the_end_of_memory;
using regex_run::match_as_text;
using regex_run::Program;
using regex_run::search;
using regex_run::shown;
using namespace std::string_view_literals;

// ---- what is found

struct Row {
  std::string_view pattern;
  std::string_view subject;
  const char* found;
};

void expect_rows(const std::vector<Row>& rows) {
  for (const Row& row : rows) {
    EXPECT_EQ(search(row.pattern, row.subject), row.found)
        << shown(row.pattern) << " on " << shown(row.subject);
  }
}

TEST(zxregexe, the_first_place_wins) {
  expect_rows({
      {"", "", "0-0"},
      {"", "abc", "0-0"},
      {"b", "abc", "1-2"},
      {"b", "acd", "no"},
      {"b", "", "no"},
      {"b|ab", "ab", "0-2"},
      {"c|b", "abc", "1-2"},
      {"bc", "abbc", "2-4"},
      {"a*", "baaa", "0-0"},
      {"a+", "baaa", "1-4"},
      {"(b|c)d", "abcd", "2-4 1:2-3"},
      {"\xff"sv, "a\xff"sv, "1-2"},
      {"`377", "a\xff"sv, "1-2"},
      {"`0", "a\0b"sv, "1-2"},
      {"a\0b"sv, "xa\0b"sv, "1-4"},
      {"a`0b", "a\0c"sv, "no"},
  });
}

TEST(zxregexe, the_left_alternative_wins) {
  expect_rows({
      {"a|ab", "ab", "0-1"},
      {"ab|a", "ab", "0-2"},
      {"|a", "a", "0-0"},
      {"a|", "b", "0-0"},
      {"a||b", "b", "0-0"},
      {"(a|ab)(c|bcd)(d*)", "abcd", "0-4 1:0-1 2:1-4 3:4-4"},
      {"(a|ab)(bc|c)?", "abc", "0-3 1:0-1 2:1-3"},
      {"(ab|a)(bc|c)?", "abc", "0-3 1:0-2 2:2-3"},
      {"{{a|b}}c", "bc", "0-2"},
      {"x{{a|b|}}c", "xc", "0-2"},
  });
}

TEST(zxregexe, anchors_and_any_byte) {
  expect_rows({
      {"^", "ab", "0-0"},
      {"$", "ab", "2-2"},
      {"^$", "", "0-0"},
      {"^$", "a", "no"},
      {"^b", "ab", "no"},
      {"a$", "aa", "1-2"},
      {"a$", "a\n", "no"},
      {"^a", "\na", "no"},
      {"a^", "a", "no"},
      {"$a", "a", "no"},
      {"^^a$$", "a", "0-1"},
      {"a|^b", "cb", "no"},
      {".", "", "no"},
      {".", "\n", "0-1"},
      {".", "\0"sv, "0-1"},
      {".*", "a\nb", "0-3"},
      {"^.$", "\xff"sv, "0-1"},
      {"a.b", "a\r\nb", "no"},
      {"(^a|b)*c", "abc", "0-3 1:1-2"},
      {"^?b", "ab", "1-2"},
  });
}

TEST(zxregexe, an_escaped_byte_stands_for_itself) {
  expect_rows({
      {"a`.b", "axb a.b", "4-7"},
      {"a`.b", "axb", "no"},
      {"a\\.b", "axb a.b", "4-7"},
      {"a\\.b", "axb", "no"},
      {"^`d*$", "", "0-0"},
      {"^`d*$", "0123456789", "0-10"},
      {"^`d*$", "12a", "no"},
      {"``", "a`", "1-2"},
      {"`\\", "a\\", "1-2"},
      {"`101`102", "AB", "0-2"},
      {"[]a]+", "a]b", "0-2"},
      {"[-a]+", "a-b", "0-2"},
      {"[a-]+", "-a]", "0-2"},
      {"[`d`s]+", "x1 2y", "1-4"},
  });
}

TEST(zxregexe, braces_that_count_nothing_are_text) {
  expect_rows({
      {"^a{2,3$", "a{2,3", "0-5"},
      {"^a{x}$", "a{x}", "0-4"},
      {"^a{,3}$", "a{,3}", "0-5"},
      {"^{x}$", "{x}", "0-3"},
      {"^a{2$", "a{2", "0-3"},
      {"^{$", "{", "0-1"},
      {"^a{x}b{y}$", "a{x}b{y}", "0-8"},
      {"^{a{b}c}$", "{a{b}c}", "0-7"},
      {"^x{*y$", "x{{{y", "0-5"},
      {"^x{*y$", "xy", "0-2"},
      {"^a{2,3$", "aa", "no"},
  });
}

TEST(zxregexe, a_literal_of_300_bytes_is_found) {
  std::string text;
  for (int i = 0; i < 300; ++i) text += static_cast<char>('a' + i % 23);
  EXPECT_EQ(search(text, "xx" + text + "yy"), "2-302");
  EXPECT_EQ(search(text, text.substr(0, 299)), "no");
  EXPECT_EQ(search("^" + text + "$", text), "0-300");
  for (const std::size_t place : {0U, 126U, 127U, 128U, 253U, 254U, 299U}) {
    std::string other = text;
    other[place] = '#';
    EXPECT_EQ(search(text, other), "no") << place;
  }
  EXPECT_EQ(search(text + "*", text.substr(0, 299)), "0-299");
}

// ---- groups

TEST(zxregexe, groups_hold_their_last_pass) {
  expect_rows({
      {"(a)", "ba", "1-2 1:1-2"},
      {"()", "a", "0-0 1:0-0"},
      {"()a", "a", "0-1 1:0-0"},
      {"(a)(b)", "ab", "0-2 1:0-1 2:1-2"},
      {"((a)(b))", "ab", "0-2 1:0-2 2:0-1 3:1-2"},
      {"(a|b)*", "abab", "0-4 1:3-4"},
      {"(a|b)+", "xabab", "1-5 1:4-5"},
      {"(ab)+", "ababa", "0-4 1:2-4"},
      {"(a*)(a*)", "aaa", "0-3 1:0-3 2:3-3"},
      {"(a+?)(a*)", "aaa", "0-3 1:0-1 2:1-3"},
      {"(a*?)(a*)", "aaa", "0-3 1:0-0 2:0-3"},
      {"((a)|b)*", "ab", "0-2 1:1-2 2:0-1"},
      {"(a(b)?)+", "aba", "0-3 1:2-3 2:1-2"},
      {"(a)(b)(c)(d)(e)(f)(g)(h)(i)", "abcdefghi",
       "0-9 1:0-1 2:1-2 3:2-3 4:3-4 5:4-5 6:5-6 7:6-7 8:7-8 9:8-9"},
  });
}

TEST(zxregexe, a_group_that_takes_no_part_is_unset) {
  expect_rows({
      {"(a)|b", "b", "0-1"},
      {"(a)*b", "b", "0-1"},
      {"(a*)b", "b", "0-1 1:0-0"},
      {"(a)?b", "b", "0-1"},
      {"(a)|(b)", "b", "0-1 2:0-1"},
      {"{{a|b}}c", "bc", "0-2"},
  });
}

TEST(zxregexe, a_group_that_is_gone_back_on_is_put_back) {
  expect_rows({
      {"{{(a)b|ac}}", "ac", "0-2"},
      {"^{{(a)|(ab)}}c", "abc", "0-3 2:0-2"},
      {"(a)?(ab)?", "ab", "0-1 1:0-1"},
      {"(a)?ab", "ab", "0-2"},
      {"(a)?ab", "aab", "0-3 1:0-1"},
      {"((a)(b)|a)b", "ab", "0-2 1:0-1"},
      {"(a|b)*b", "abab", "0-4 1:2-3"},
      {"((a)|(b))*b", "abab", "0-4 1:2-3 2:2-3 3:1-2"},
      {"(a|ab)(b|c)*d", "abcd", "0-4 1:0-1 2:2-3"},
      {"{{(a)(b)c|(a)b}}d", "abd", "0-3 3:0-1"},
      {"(x(y)?)*xz", "xyxz", "0-4 1:0-2 2:1-2"},
  });
}

// The eleventh pair of parentheses is the innermost.
TEST(zxregexe, groups_ten_and_eleven_pass_on) {
  EXPECT_EQ(search("()()()()()()()()()(a)(b)", "xaby"),
            "1-3 1:1-1 2:1-1 3:1-1 4:1-1 5:1-1 6:1-1 7:1-1 8:1-1 9:1-1");
  const std::string open(9, '(');
  const std::string close(9, ')');
  EXPECT_EQ(search("(" + open + "(a|b)c" + close + "*)", "bcac"),
            "0-4 1:0-4 2:2-4 3:2-4 4:2-4 5:2-4 6:2-4 7:2-4 8:2-4 9:2-4");
}

// ---- counters of alternatives

// The counters of slot 0 and of the groups that took part: "0=2 1=1".
std::string counters(std::string_view pattern, std::string_view subject) {
  if (search(pattern, subject) == "no") return "no";
  std::string text = "0=" + std::to_string(zx_match.alternative[0]);
  for (int slot = 1; slot <= k_regex_groups; ++slot) {
    if (zx_match.end[slot] == nullptr) continue;
    text += " " + std::to_string(slot) + "=" +
            std::to_string(zx_match.alternative[slot]);
  }
  return text;
}

TEST(zxregexe, counters_tell_the_alternative_that_was_taken) {
  const Row rows[] = {
      {"abc", "abc", "0=0"},
      {"a|b|c", "a", "0=1"},
      {"a|b|c", "b", "0=2"},
      {"a|b|c", "c", "0=3"},
      {"(a|b)(c|d)", "bd", "0=0 1=2 2=2"},
      {"(a|b)(c|d)", "bc", "0=0 1=2 2=1"},
      {"(a)(b)", "ab", "0=0 1=0 2=0"},
      {"(a)|(b)", "b", "0=2 2=0"},
      {"((a|b)|c)d", "bd", "0=0 1=1 2=2"},
      {"((a|b)|c)d", "cd", "0=0 1=2"},
      {"{{a|b}}c", "bc", "0=2"},
      {"a*b|c", "c", "0=2"},
      {"%d|%s", "x", "0=2"},
  };
  for (const Row& row : rows)
    EXPECT_EQ(counters(row.pattern, row.subject), row.found) << row.pattern;
}

// Optional pieces are two alternatives of the group that was last entered,
// loops of groups as well; nothing puts a counter back.
TEST(zxregexe, optional_and_repeated_pieces_count_too) {
  const Row rows[] = {
      {"colou?r", "colour", "0=1"},
      {"colou?r", "color", "0=2"},
      {"(a|b)c?", "bc", "0=0 1=1"},
      {"(a|b)c?", "b", "0=0 1=2"},
      {"ab?c|ad", "ad", "0=3"},
      {"ab?c|ad", "abc", "0=1"},
      {"ab?c|ad", "ac", "0=2"},
      {"(a)(b|c)?", "a", "0=0 1=2"},
      {"(a)(b|c)?", "ac", "0=0 1=1 2=2"},
      {"((a|b)c|bd)", "bd", "0=0 1=2"},
      {"x|{{a|b}}", "x", "0=1"},
      {"x|{{a|b}}", "a", "0=1"},
      {"x|{{a|b}}", "b", "0=2"},
      {"(a|b){{c|d}}e?", "bd", "0=2 1=2"},
      {"(a|b){{c|d}}e?", "bce", "0=1 1=2"},
      // The pass that fails leaves 2 behind, or 0, and the exit is next.
      {"(a|b)*", "abb", "0=1 1=3"},
      {"(a|b)+", "b", "0=0 1=3"},
      {"(a)*", "", "0=2"},
      {"(a)*", "a", "0=1 1=1"},
      {"%d?x", "x", "0=2"},
      // Each try of a repetition counts in the group it began in, though the
      // one before it entered another.
      {"(.*b?{{cd}})", "acdc", "0=0 1=2"},
      {"(.*?b?{{cd}})", "cbcd", "0=0 1=1"},
      {"(.{0,9}b?{{cd}})", "acdc", "0=0 1=2"},
      {"(.{0,9}?b?{{cd}})", "cbcd", "0=0 1=1"},
  };
  for (const Row& row : rows)
    EXPECT_EQ(counters(row.pattern, row.subject), row.found) << row.pattern;
}

// ---- references

TEST(zxregexe, a_reference_repeats_the_bytes_of_a_group) {
  expect_rows({
      {"(a)`1", "aa", "0-2 1:0-1"},
      {"(a)`1", "aA", "no"},
      {"(a)`1", "a", "no"},
      {"(aa)`1", "aaa", "no"},
      {"(a*)b`1", "aabaa", "0-5 1:0-2"},
      {"(a*)b`1", "aaba", "1-4 1:1-2"},
      {"(.)(.)`2`1", "abba", "0-4 1:0-1 2:1-2"},
      {"()`1a", "a", "0-1 1:0-0"},
      {"(x*)`1y", "y", "0-1 1:0-0"},
      {"(a)`1?", "a", "0-1 1:0-1"},
      {"(a)`1?", "aa", "0-2 1:0-1"},
      {"(.)`1", "a\0\0"sv, "1-3 1:1-2"},
      {"(a)`12", "aa2", "0-3 1:0-1"},
      {"(a)(`1b)+", "aabab", "0-5 1:0-1 2:3-5"},
  });
}

TEST(zxregexe, a_reference_to_an_unset_group_fails) {
  expect_rows({
      {"(x)?`1y", "y", "no"},
      {"(x)?`1y", "xxy", "0-3 1:0-1"},
      {"`1(a)", "aa", "no"},
      {"(a`1)", "aa", "no"},
      {"`9", "a", "no"},
      {"`1?(a)", "a", "0-1 1:0-1"},
      {"{{(a)|b}}`1", "ba", "no"},
  });
}

// In the second pass the group starts behind its old end.
TEST(zxregexe, a_reference_into_its_own_group_fails_in_every_pass) {
  expect_rows({
      {"{{(a`1?)b}}+", "abab", "0-4 1:2-3"},
      {"^{{(a`1?)b}}+$", "ababab", "0-6 1:4-5"},
      {"{{(a`1)b|(a)b}}+", "abab", "0-4 2:2-3"},
  });
}

// ---- bytes and classes

bool within(int byte, int low, int high) { return byte >= low && byte <= high; }

struct ByteClass {
  const char* pattern;
  bool (*holds)(int byte);
};

bool is_digit(int byte) { return within(byte, '0', '9'); }
bool is_word(int byte) {
  return is_digit(byte) || within(byte, 'A', 'Z') || within(byte, 'a', 'z');
}
bool is_space(int byte) { return byte == ' ' || within(byte, 9, 13); }
bool is_dos_letter(int byte) { return within(byte, 128, 154); }
bool is_windows_letter(int byte) { return within(byte, 224, 250); }

constexpr ByteClass k_byte_classes[] = {
    {"`h", is_dos_letter},
    {"`H", [](int byte) { return !is_dos_letter(byte); }},
    {"`a", is_windows_letter},
    {"`A", [](int byte) { return !is_windows_letter(byte); }},
    {"`w", is_word},
    {"`W", [](int byte) { return !is_word(byte); }},
    {"`s", is_space},
    {"`S", [](int byte) { return !is_space(byte); }},
    {"`d", is_digit},
    {"`D", [](int byte) { return !is_digit(byte); }},
    {"[`h]", is_dos_letter},
    {"[`H]", [](int byte) { return !is_dos_letter(byte); }},
    {"[`a]", is_windows_letter},
    {"[`A]", [](int byte) { return !is_windows_letter(byte); }},
    {"[`w]", is_word},
    {"[`W]", [](int byte) { return !is_word(byte); }},
    {"[`s]", is_space},
    {"[`S]", [](int byte) { return !is_space(byte); }},
    {"[`d]", is_digit},
    {"[`D]", [](int byte) { return !is_digit(byte); }},
    {"[^`h]", [](int byte) { return !is_dos_letter(byte); }},
    {"[^`D]", is_digit},
    {"[^`w`s]", [](int byte) { return !is_word(byte) && !is_space(byte); }},
    {"[`a`h]",
     [](int byte) { return is_dos_letter(byte) || is_windows_letter(byte); }},
    {"[^a]", [](int byte) { return byte != 'a'; }},
    {"[^`0]", [](int byte) { return byte != 0; }},
    {"[^`377]", [](int byte) { return byte != 255; }},
    {"[`000`377]", [](int byte) { return byte == 0 || byte == 255; }},
    {"[a-fx]", [](int byte) { return within(byte, 'a', 'f') || byte == 'x'; }},
    {"[`200-`377]", [](int byte) { return byte >= 128; }},
    {"[`000-`377]", [](int) { return true; }},
    {"[^`000-`377]", [](int) { return false; }},
    {".", [](int) { return true; }},
    {"x", [](int byte) { return byte == 'x'; }},
    {"`0", [](int byte) { return byte == 0; }},
    {"`377", [](int byte) { return byte == 255; }},
};

TEST(zxregexe, a_class_takes_its_bytes) {
  for (const ByteClass& row : k_byte_classes) {
    const Program program(std::string("^") + row.pattern + "$");
    for (int byte = 0; byte < 256; ++byte) {
      const std::string subject(1, static_cast<char>(byte));
      EXPECT_EQ(search(program.get(), subject), row.holds(byte) ? "0-1" : "no")
          << row.pattern << " " << byte;
    }
    EXPECT_EQ(search(program.get(), ""), "no");
  }
}

// Runs of different lengths, since long ones may be walked in wide steps.
TEST(zxregexe, a_repeated_class_takes_its_bytes) {
  constexpr std::size_t k_lengths[] = {1, 15, 16, 17, 40};
  for (const ByteClass& row : k_byte_classes) {
    const Program star(std::string("^x") + row.pattern + "*");
    const Program lazy(std::string("^x") + row.pattern + "*?$");
    const Program counted(std::string("^x") + row.pattern + "{1,16}");
    for (int byte = 0; byte < 256; ++byte) {
      for (const std::size_t length : k_lengths) {
        const std::string subject =
            "x" + std::string(length, static_cast<char>(byte));
        const std::size_t taken = row.holds(byte) ? length : 0;
        const auto span = [](std::size_t count) {
          return "0-" + std::to_string(1 + count);
        };
        ASSERT_EQ(search(star.get(), subject), span(taken))
            << row.pattern << " " << byte;
        ASSERT_EQ(search(lazy.get(), subject), taken ? span(taken) : "no")
            << row.pattern << " " << byte;
        ASSERT_EQ(search(counted.get(), subject),
                  taken ? span(std::min<std::size_t>(taken, 16)) : "no")
            << row.pattern << " " << byte;
      }
    }
  }
}

// The byte that ends a run stands at each place of it.
TEST(zxregexe, a_repeated_class_ends_at_the_first_other_byte) {
  for (const ByteClass& row : k_byte_classes) {
    int in = -1;
    int out = -1;
    for (int byte = 0; byte < 256; ++byte) (row.holds(byte) ? in : out) = byte;
    if (in < 0 || out < 0) continue;
    const Program program(std::string("^") + row.pattern + "*");
    for (std::size_t place = 0; place < 70; ++place) {
      std::string subject(70, static_cast<char>(in));
      subject[place] = static_cast<char>(out);
      EXPECT_EQ(search(program.get(), subject), "0-" + std::to_string(place))
          << row.pattern;
    }
  }
}

// For boundaries, the letters of the DOS code page are letters.
bool bounds(int byte) { return is_word(byte) || is_dos_letter(byte); }

TEST(zxregexe, a_boundary_stands_between_all_pairs_that_differ) {
  const Program boundary("^.`b.$");
  const Program none("^.`B.$");
  for (int left = 0; left < 256; ++left) {
    for (int right = 0; right < 256; ++right) {
      const char subject[] = {static_cast<char>(left),
                              static_cast<char>(right)};
      const bool differ = bounds(left) != bounds(right);
      ASSERT_EQ(regexec(boundary.get(), subject, subject + 2), differ)
          << left << " " << right;
      ASSERT_EQ(regexec(none.get(), subject, subject + 2), !differ)
          << left << " " << right;
    }
  }
}

TEST(zxregexe, the_ends_of_the_subject_bound_words) {
  for (int byte = 0; byte < 256; ++byte) {
    const std::string subject(1, static_cast<char>(byte));
    EXPECT_EQ(search("^`b.", subject), bounds(byte) ? "0-1" : "no") << byte;
    EXPECT_EQ(search("^`B.", subject), bounds(byte) ? "no" : "0-1") << byte;
    EXPECT_EQ(search(".`b$", subject), bounds(byte) ? "0-1" : "no") << byte;
    EXPECT_EQ(search(".`B$", subject), bounds(byte) ? "no" : "0-1") << byte;
  }
  EXPECT_EQ(search("`b", ""), "no");
  EXPECT_EQ(search("`B", ""), "0-0");
  EXPECT_EQ(search("`bfoo`b", "afoo foob foo"), "10-13");
}

// ---- going on behind an earlier match

std::string search_from(std::string_view pattern, std::string_view subject,
                        char prev_char) {
  const Program program(pattern);
  const std::string_view text = at_the_end_of_memory(subject);
  if (!regexec_from(program.get(), text.data(), text.data() + text.size(),
                    prev_char))
    return "no";
  return match_as_text(text);
}

TEST(zxregexe, no_start_is_found_in_the_rest_of_a_text) {
  EXPECT_EQ(search_from("^", "a", 'x'), "no");
  EXPECT_EQ(search_from("^a", "a", 'x'), "no");
  EXPECT_EQ(search_from("^a", "a", '\0'), "no");
  EXPECT_EQ(search_from("^.a", "ba", 'x'), "no");
  EXPECT_EQ(search_from("^a|b", "ab", 'x'), "1-2");
  EXPECT_EQ(search_from("{{^|b}}a", "aba", 'x'), "1-3");
  EXPECT_EQ(search_from("^?a", "a", 'x'), "0-1");
  EXPECT_EQ(search_from("a$", "ba", 'x'), "1-2");
  EXPECT_EQ(search_from("(a)", "ba", 'x'), "1-2 1:1-2");
}

TEST(zxregexe, the_byte_ahead_of_the_rest_counts_for_boundaries) {
  for (int byte = 0; byte < 256; ++byte) {
    const char prev = static_cast<char>(byte);
    EXPECT_EQ(search_from("`bfoo", "foo", prev), bounds(byte) ? "no" : "0-3");
    EXPECT_EQ(search_from("`Bfoo", "foo", prev), bounds(byte) ? "0-3" : "no");
    EXPECT_EQ(search_from("`b", "", prev), bounds(byte) ? "0-0" : "no");
  }
  EXPECT_EQ(search_from("`bfoo", "foo foo", 'x'), "4-7");
}

TEST(zxregexe, the_start_is_found_again_in_the_next_whole_subject) {
  EXPECT_EQ(search_from("^a", "a", 'x'), "no");
  EXPECT_EQ(search("^a", "a"), "0-1");
  EXPECT_EQ(search("`ba", "a"), "0-1");
}

// ---- repetitions

TEST(zxregexe, greedy_lazy_and_counted_repetitions) {
  expect_rows({
      {"x.*y", "xayby", "0-5"},
      {"x.*?y", "xayby", "0-3"},
      {"x.+y", "xyy", "0-3"},
      {"x.+?y", "xyy", "0-3"},
      {"x.+?y", "xyay", "0-4"},
      {"x.*?y", "xy", "0-2"},
      {"a+?", "aaa", "0-1"},
      {"a*?", "aaa", "0-0"},
      {"a*?b", "aab", "0-3"},
      {"^a*?$", "aaa", "0-3"},
      {"a*ab", "aaab", "0-4"},
      {"a*?ab", "aaab", "0-4"},
      {"a+ab", "aaab", "0-4"},
      {"a+ab", "ab", "no"},
      {".*ab", "ababx", "0-4"},
      {".*?ab", "xabab", "0-3"},
      {"[ab]*b", "abba", "0-3"},
      {"[ab]*?b", "abba", "0-2"},
      {"`d*5", "12535", "0-5"},
      {"`d*?5", "12535", "0-3"},
      {"`d+?5", "512", "no"},
      {"`d+5", "5125", "0-4"},
      {"a{2,3}", "aaaa", "0-3"},
      {"a{2,3}", "a", "no"},
      {"a{2,3}?", "aaaa", "0-2"},
      {"^a{2,3}?$", "aaa", "0-3"},
      {"^a{2,3}?$", "aaaa", "no"},
      {"a{2,3}?a", "aaaa", "0-3"},
      {"a{2}", "aaa", "0-2"},
      {"^a{2}$", "aaa", "no"},
      {"a{0}", "aa", "0-0"},
      {"a{0}b", "ab", "1-2"},
      {"^a{0,1}b", "b", "0-1"},
      {"^a{0,1}b", "aab", "no"},
      {"a{2,}", "aaaaa", "0-5"},
      {"a{2,}?", "aaaaa", "0-2"},
      {"^.{3}b", "aaab", "0-4"},
      {"^.{3}b", "aab", "no"},
      {"a{1,2}ab", "aaab", "0-4"},
      {"a{1,2}?aab", "aaab", "0-4"},
      {"ab{2}c", "abbc", "0-4"},
      {"ab{2}c", "ababc", "no"},
      {"a?", "a", "0-1"},
      {"a?", "b", "0-0"},
      {"a?ab", "ab", "0-2"},
      {"a?b", "b", "0-1"},
      {".*", "", "0-0"},
      {".+", "", "no"},
      {"a.{0,2}b", "axxxb", "no"},
      {"a.{0,2}b", "axxb", "0-4"},
      {"a*b*c*", "aabbcc", "0-6"},
      {"a*b*c*d", "aabbcce", "no"},
      {"x*", "y", "0-0"},
      {".*$", "ab", "0-2"},
      {".*?$", "ab", "0-2"},
      {".*`b", "ab ", "0-2"},
      {"[^,]*,", "ab,cd,", "0-3"},
      {"{{a|b}}*ab", "abab", "0-4"},
      {".*\0b"sv, "a\0b\0c"sv, "0-3"},
      {"a*`377", "aa\xff"sv, "0-3"},
  });
}

TEST(zxregexe, and_more_ends_at_32767) {
  const std::string subject(40000, 'a');
  EXPECT_EQ(search("^a{1,}", subject), "0-32767");
  EXPECT_EQ(search("^a{1,}$", subject), "no");
  EXPECT_EQ(search("^a{1,}?$", subject), "no");
  EXPECT_EQ(search("^a{1,}?$", subject.substr(0, 32767)), "0-32767");
  EXPECT_EQ(search("^.{0,}", subject), "0-32767");
  EXPECT_EQ(search("^[ab]{32767}", subject), "0-32767");
  EXPECT_EQ(search("^[ab]{32767}", subject.substr(0, 32766)), "no");
  EXPECT_EQ(search("^a+", subject), "0-40000");
  EXPECT_EQ(search("^a*$", subject), "0-40000");
}

// A pass of a loop that takes nothing is none.
TEST(zxregexe, empty_passes_of_a_loop_end_it) {
  expect_rows({
      {"(a{0,2})*", "aaaa", "0-4 1:2-4"},
      {"(a{0,2})*", "aaab", "0-3 1:2-3"},
      {"(a{0,2})*", "", "0-0"},
      {"(a{0,2})*", "b", "0-0"},
      {"(a{0,2})*b", "aab", "0-3 1:0-2"},
      {"{{a{0,2}}}+b", "b", "0-1"},
      {"{{a{0,2}}}+b", "aaab", "0-4"},
      {"{{a{0,2}}}+b", "aaa", "no"},
      {"(a{0,2})+", "b", "0-0 1:0-0"},
      {"(a{0,2})+", "aa", "0-2 1:0-2"},
      {"(a{0,2}?)*b", "aaab", "0-4 1:2-3"},
      {"(a{0})*b", "ab", "1-2"},
      {"((a{0,1})*)c", "aac", "0-3 1:0-2 2:1-2"},
      {"(a{0,1}b{0,1})*c", "abac", "0-4 1:2-3"},
  });
}

TEST(zxregexe, the_literal_to_be_contained_changes_no_match) {
  expect_rows({
      {".*abc", "xxabcab", "0-5"},
      {".*abc", "xxab", "no"},
      {".*abc", "", "no"},
      {"x?abc", "ababc", "2-5"},
      {"x*ab.cd", "ab_cd", "0-5"},
      {"x*ab.cd", "cd_ab", "no"},
      {"(a*)bcd", "aabcd", "0-5 1:0-2"},
      {".*(foo)?bar", "bar", "0-3"},
      {".*a`0b", "xa\0b"sv, "0-4"},
      {".*`0", "ab\0"sv, "0-3"},
  });
}

// ---- typed fields

struct FieldRow {
  const char* field;
  std::string_view subject;
  int end;  // where the field ends; -1: no match at the start
};

int end_of_field(const zxRegex* regex, std::string_view subject) {
  const std::string_view text = at_the_end_of_memory(subject);
  if (!regexec(regex, text.data(), text.data() + text.size())) return -1;
  EXPECT_EQ(zx_match.field[0].start, text.data());
  EXPECT_EQ(zx_match.field[0].end, zx_match.end[0]);
  return static_cast<int>(zx_match.end[0] - text.data());
}

void expect_fields(const std::vector<FieldRow>& rows) {
  for (const FieldRow& row : rows) {
    const Program program(std::string("^") + row.field);
    EXPECT_EQ(end_of_field(program.get(), row.subject), row.end)
        << row.field << " on " << shown(row.subject);
  }
}

TEST(zxregexe, d_is_a_decimal_integer) {
  expect_fields({
      {"%d", "5", 1},     {"%d", "42", 2},       {"%d", "0", 1},
      {"%d", "-5", 2},    {"%d", "+5", 2},       {"%d", "  42", 4},
      {"%d", "  -42", 5}, {"%d", "42x", 2},      {"%d", "42 ", 2},
      {"%d", "4 2", 1},   {"%d", "1.5", 1},      {"%d", "0x1", 1},
      {"%d", "12h", 2},   {"%d", "007", 3},      {"%d", "", -1},
      {"%d", " ", -1},    {"%d", "   ", -1},     {"%d", "x", -1},
      {"%d", "-", -1},    {"%d", "+", -1},       {"%d", "- 5", -1},
      {"%d", "+-5", -1},  {"%d", "--5", -1},     {"%d", "\t5", -1},
      {"%d", "\n5", -1},  {"%d", "\0005"sv, -1}, {"%d", "5\0"sv, 1},
      {"%d", " -", -1},   {"%d", "a5", -1},      {"%*d", " 42", 3},
      {"%-d", " -42", 4}, {"%.0d", "42", 2},     {"%.3d", "1234", 4},
  });
}

TEST(zxregexe, d_fits_a_signed_number) {
  expect_fields({
      {"%d", "2147483647", 10},
      {"%d", "2147483648", -1},
      {"%d", "+2147483647", 11},
      {"%d", "+2147483648", -1},
      {"%d", "-2147483647", 11},
      {"%d", "-2147483648", -1},
      {"%d", "-2147483649", -1},
      {"%d", "2147483650", -1},
      {"%d", "4294967295", -1},
      {"%d", "4294967296", -1},
      {"%d", "4294967297", -1},
      {"%d", "8589934593", -1},
      {"%d", "21474836470", -1},
      {"%d", "42949672960", -1},
      {"%d", "18446744073709551617", -1},
      {"%d", "99999999999999999999999999", -1},
      {"%d", "00000000002147483647", 20},
      {"%d", "00000000002147483648", -1},
      {"%d", "2147483647x", 10},
      {"%9d", "2147483648", 9},
      {"%10d", "2147483647", 10},
      {"%10d", "2147483648", -1},
      {"%20d", "00000000002147483647", 20},
      {"%20d", "          2147483647", 20},
      {"%20d", "          2147483648", -1},
  });
}

TEST(zxregexe, d_with_an_equals_sign_has_no_sign_and_fits_an_unsigned_one) {
  expect_fields({
      {"%=d", "5", 1},
      {"%=d", " 5", 2},
      {"%=d", "-5", -1},
      {"%=d", "+5", -1},
      {"%=d", "2147483648", 10},
      {"%=d", "4294967295", 10},
      {"%=d", "4294967296", -1},
      {"%=d", "4294967299", -1},
      {"%=d", "4294967305", -1},
      {"%=d", "8589934592", -1},
      {"%=d", "42949672950", -1},
      {"%=d", "18446744073709551616", -1},
      {"%=10d", "4294967295", 10},
      {"%=10d", "4294967296", -1},
      {"%=5d", "00042", 5},
      {"%=5d", "  -42", -1},
  });
}

TEST(zxregexe, d_with_a_plus_needs_a_sign) {
  expect_fields({
      {"%+d", "5", -1},
      {"%+d", "+5", 2},
      {"%+d", "-5", 2},
      {"%+d", " +5", 3},
      {"%+d", " 5", -1},
      {"%+d", "+", -1},
      {"%+d", "", -1},
      {"%+5d", "  +42", 5},
      {"%+5d", "00042", -1},
      {"% +d", "  x", -1},
      {"% +3d", "   ", 3},
      {"% +d", " +1", 3},
      {"%+=d", "5", -1},
      {"%+=d", "+5", -1},
  });
}

TEST(zxregexe, d_with_a_zero_skips_no_blanks) {
  expect_fields({
      {"%0d", "5", 1},
      {"%0d", " 5", -1},
      {"%0d", "-5", 2},
      {"%0d", "05", 2},
      {"%0d", "", -1},
      {"%05d", "00042", 5},
      {"%05d", "   42", -1},
      {"%05d", "-0042", 5},
      {"%05d", "12345", 5},
      {"%05d", "1234", -1},
      {"%05d", "1234 ", -1},
      {"% 0d", " 5", 0},
      {"% 0d", "x", 0},
      {"% 0d", "7", 1},
      {"% 0d", "-", -1},
      {"%0 5d", "     ", -1},
  });
}

TEST(zxregexe, d_with_a_blank_may_be_empty) {
  expect_fields({
      {"% d", "", 0},       {"% d", "   ", 3},     {"% d", " x", 1},
      {"% d", "x", 0},      {"% d", "-", -1},      {"% d", "+", -1},
      {"% d", "-x", -1},    {"% d", " -5", 3},     {"% d", "5", 1},
      {"% 5d", "     ", 5}, {"% 5d", "      ", 5}, {"% 5d", "     7", 5},
      {"% 5d", "   42", 5}, {"% 5d", "    x", -1}, {"% 5d", "    -", -1},
      {"% 5d", "x", -1},    {"% 5d", "42", -1},    {"% 1d", " ", 1},
      {"% 1d", "7", 1},     {"% 1d", "-", -1},     {"% 1d", "x", -1},
  });
}

TEST(zxregexe, d_with_a_width_uses_exactly_that) {
  expect_fields({
      {"%5d", "   42", 5},  {"%5d", "  42", -1},    {"%5d", "00042", 5},
      {"%5d", "42   ", -1}, {"%5d", "-0042", 5},    {"%5d", "  -42", 5},
      {"%5d", "12345", 5},  {"%5d", "123456", 5},   {"%5d", "1234", -1},
      {"%5d", "     ", -1}, {"%5d", "    -", -1},   {"%5d", "    -1", -1},
      {"%5d", "-1234", 5},  {"%5d", "-12345", 5},   {"%5d", "1-234", -1},
      {"%5d", "12 34", -1}, {"%5d", "      5", -1}, {"%5d", "", -1},
      {"%1d", "7", 1},      {"%1d", "77", 1},       {"%1d", "-", -1},
      {"%1d", "-7", -1},    {"%1d", " ", -1},       {"%1d", " 7", -1},
      {"%2d", "-7", 2},     {"%2d", "-77", 2},      {"%2d", " -7", -1},
      {"%2d", "+", -1},     {"%___d", "   42", 5},  {"%___d", "  42", -1},
      {"%_d", " 42", 3},    {"%5.2d", "   42", 5},
  });
}

TEST(zxregexe, x_is_a_hexadecimal_integer) {
  expect_fields({
      {"%x", "f", 1},    {"%x", "FF", 2},   {"%x", "aF09", 4}, {"%x", "g", -1},
      {"%x", "", -1},    {"%x", "-", -1},   {"%x", "-1f", 3},  {"%x", "+1f", 3},
      {"%x", " 1f", 3},  {"%x", "1g", 1},   {"%x", "x1", -1},  {"%x", "@", -1},
      {"%x", "`", -1},   {"%x", "G", -1},   {"%x", "/", -1},   {"%x", ":", -1},
      {"%0x", " 1", -1}, {"%0x", "1", 1},   {"%+x", "1", -1},  {"%+x", "+1", 2},
      {"%=x", "-1", -1}, {"%=x", "+1", -1}, {"% x", "", 0},    {"% x", "  ", 2},
      {"% x", "g", 0},   {"% x", "-", -1},
  });
}

TEST(zxregexe, x_may_have_a_prefix_that_something_follows) {
  expect_fields({
      {"%x", "0x1f", 4},   {"%x", "0X1F", 4},    {"%x", "-0x1F", 5},
      {"%x", " 0x1", 4},   {"%x", "0x", 1},      {"%x", "0X", 1},
      {"%x", "0xg", -1},   {"%x", "0x ", -1},    {"%x", "-0x", 2},
      {"%x", "-0xg", -1},  {"%x", "0x0x1", 3},   {"%x", "00x1", 2},
      {"%x", "0x-1", -1},  {"%x", "0x\0"sv, -1}, {"% x", "0xg", -1},
      {"% x", "0x", 1},    {"%2x", "0x", -1},    {"%2x", "0x1", -1},
      {"%2x", "0x12", -1}, {"%3x", "0x1", 3},    {"%3x", "0x12", 3},
      {"%3x", "0xf", 3},   {"%3x", "0xg", -1},   {"%3x", "0x", -1},
      {"%3x", "-0x", -1},  {"%3x", "-0x1", -1},  {"%4x", "-0x1", 4},
      {"%4x", "+0xf", 4},  {"%4x", "0x1f", 4},   {"%4x", " 0x1", 4},
      {"%4x", "0x1", -1},  {"%_x", "0x1", 3},    {"%1x", "0x1", 1},
  });
}

TEST(zxregexe, x_without_a_prefix_may_end_in_h) {
  expect_fields({
      {"%x", "1fh", 3},    {"%x", "1fH", 3},   {"%x", "1fhh", 3},
      {"%x", "0h", 2},     {"%x", "-1h", 3},   {"%x", "h", -1},
      {"%x", "0xh", -1},   {"%x", "0x1fh", 4}, {"%x", "1 h", 1},
      {"% x", "h", 0},     {"% x", " h", 1},   {"%2x", "1h", 2},
      {"%2x", "12h", 2},   {"%2x", "ff", 2},   {"%2x", " f", 2},
      {"%2x", "f", -1},    {"%2x", "fg", -1},  {"%2x", "-f", 2},
      {"%2x", "h", -1},    {"%2x", " h", -1},  {"%3x", "12h", 3},
      {"%3x", "1h", -1},   {"%3x", "12hh", 3}, {"%3x", "123h", 3},
      {"%3x", " 1h", 3},   {"%3x", "-1h", 3},  {"%4x", "12hh", -1},
      {"%4x", "0x1h", -1}, {"% 3x", "   ", 3}, {"% 3x", "  h", -1},
  });
}

TEST(zxregexe, x_fits_a_number_of_32_bits) {
  expect_fields({
      {"%x", "7fffffff", 8},      {"%x", "7FFFFFFFh", 9},
      {"%x", "80000000", -1},     {"%x", "ffffffff", -1},
      {"%x", "-7fffffff", 9},     {"%x", "-80000000", -1},
      {"%x", "100000000", -1},    {"%x", "100000001", -1},
      {"%x", "0x7FFFFFFF", 10},   {"%x", "0x80000000", -1},
      {"%x", "007fffffff", 10},   {"%x", "1000000000000000f", -1},
      {"%=x", "80000000", 8},     {"%=x", "ffffffff", 8},
      {"%=x", "FFFFFFFFH", 9},    {"%=x", "100000000", -1},
      {"%=x", "fffffffff", -1},   {"%=x", "0xffffffff", 10},
      {"%=x", "0xffffffffh", 10}, {"%=x", "0x100000000", -1},
      {"%=x", "00ffffffff", 10},  {"%=x", "10000000000000001", -1},
      {"%8x", "7ffffffff", 8},    {"%8x", "80000000", -1},
  });
}

TEST(zxregexe, f_is_a_real) {
  expect_fields({
      {"%f", "1", 1},       {"%f", "1.5", 3},
      {"%f", ".5", 2},      {"%f", "5.", 2},
      {"%f", ".", -1},      {"%f", "", -1},
      {"%f", "  ", -1},     {"%f", "-1.5", 4},
      {"%f", "+.5", 3},     {"%f", "-.", -1},
      {"%f", "-", -1},      {"%f", "1.2.3", 3},
      {"%f", "1..2", 2},    {"%f", "1e5", 1},
      {"%f", "  1.5", 5},   {"%f", "\t1", -1},
      {"%f", "1,5", 1},     {"%f", "1k", 1},
      {"%f", "x", -1},      {"%f", "- 1", -1},
      {"%f", "..5", -1},    {"%f", "99999999999999999999.99", 23},
      {"%0f", " 1", -1},    {"%0f", "1", 1},
      {"%+f", "1", -1},     {"%+f", "+1", 2},
      {"%+f", "-.5", 3},    {"%=f", "-1", -1},
      {"%=f", "+1", -1},    {"%=f", "1", 1},
      {"% f", "", 0},       {"% f", "  ", 2},
      {"% f", "x", 0},      {"% f", " x", 1},
      {"% f", ".", -1},     {"% f", "-", -1},
      {"% f", "-.", -1},    {"% f", " 1", 2},
      {"%5f", "  1.5", 5},  {"%5f", "1.500", 5},
      {"%5f", "12345", 5},  {"%5f", "123456", 5},
      {"%5f", "1.5", -1},   {"%5f", "    .", -1},
      {"%5f", "    -", -1}, {"%5f", "   -1", 5},
      {"%5f", "1.2.3", -1}, {"%5f", "     ", -1},
      {"%5f", "1234.", 5},  {"%5f", "1234.5", 5},
      {"%5f", "-.123", 5},  {"%5f", "1.5  ", -1},
      {"% 5f", "     ", 5}, {"% 5f", "    x", -1},
      {"% 5f", "   .5", 5}, {"%1f", ".", -1},
      {"%1f", "5.", 1},     {"%2f", "-.5", -1},
      {"%05f", "001.5", 5}, {"%05f", "  1.5", -1},
  });
}

TEST(zxregexe, v_is_a_real_that_may_end_in_k_or_m) {
  expect_fields({
      {"%v", "1", 1},     {"%v", "1k", 2},    {"%v", "1m", 2},
      {"%v", "1.5m", 4},  {"%v", "1K", 1},    {"%v", "1M", 1},
      {"%v", "1km", 2},   {"%v", "1kk", 2},   {"%v", "k", -1},
      {"%v", ".5k", 3},   {"%v", "5.k", 3},   {"%v", "-1m", 3},
      {"%v", ".k", -1},   {"%v", "-k", -1},   {"%v", "1 k", 1},
      {"%v", "1.5", 3},   {"%3v", "1.k", 3},  {"%3v", "10k", 3},
      {"%3v", "10", -1},  {"%3v", "100k", 3}, {"%3v", " 1m", 3},
      {"%3v", "1m ", -1}, {"%2v", "1k", 2},   {"%2v", "1km", 2},
      {"%1v", "1k", 1},   {"% v", "", 0},     {"% v", "  ", 2},
      {"%+v", "1k", -1},  {"%+v", "+1k", 3},  {"%=v", "-1k", -1},
  });
}

TEST(zxregexe, s_is_a_token_or_a_number_of_bytes) {
  expect_fields({
      {"%s", "ab", 2},         {"%s", "ab cd", 2},     {"%s", "", -1},
      {"%s", " ab", -1},       {"%s", "\tab", -1},     {"%s", "a\tb", 1},
      {"%s", "a\nb", 1},       {"%s", "a\vb", 1},      {"%s", "a\fb", 1},
      {"%s", "a\rb", 1},       {"%s", "a\0b"sv, 3},    {"%s", "a\x1f"sv, 2},
      {"%s", "\xa0\xff"sv, 2}, {"% s", "", 0},         {"% s", " ab", 0},
      {"% s", "ab", 2},        {"%0s", "ab", 2},       {"%0s", " a", -1},
      {"%3s", "abc", 3},       {"%3s", "abcd", 3},     {"%3s", "ab", -1},
      {"%3s", "a b", 3},       {"%3s", "  a", 3},      {"%3s", "a  ", 3},
      {"%3s", "   ", -1},      {"%3s", "\t\t\t", 3},   {"%3s", "", -1},
      {"%3s", " \n ", 3},      {"%3s", "\0\0\0"sv, 3}, {"% 3s", "   ", 3},
      {"% 3s", "    ", 3},     {"% 3s", "  ", -1},     {"% 3s", "", -1},
      {"%1s", "a", 1},         {"%1s", " ", -1},       {"%_s", "a c", 3},
  });
}

TEST(zxregexe, s_ends_at_white_space_only) {
  const Program program("^%s");
  for (int byte = 0; byte < 256; ++byte) {
    const std::string subject = {'a', static_cast<char>(byte), 'a'};
    EXPECT_EQ(end_of_field(program.get(), subject), is_space(byte) ? 1 : 3)
        << byte;
  }
}

TEST(zxregexe, quoted_text_ends_at_its_own_quote) {
  expect_fields({
      {"%C", "\"ab\"", 4},       {"%C", "\"\"", 2},
      {"%C", "  \"a\"", 5},      {"%C", "\"a", -1},
      {"%C", "\"", -1},          {"%C", "", -1},
      {"%C", "  ", -1},          {"%C", "'a'", -1},
      {"%C", "~a~", -1},         {"%C", "x\"a\"", -1},
      {"%C", "\t\"a\"", -1},     {"%C", "\"a'b\"", 5},
      {"%C", "\"a\"b\"", 3},     {"%C", "\"a\nb\"", 5},
      {"%C", "\"a\0b\""sv, 5},   {"%C", "\"a\\\"b\"", 6},
      {"%C", "\"a\\", -1},       {"%C", "\"a\\\"", -1},
      {"%C", "\"\\\\\"", 4},     {"%C", "\"\\x\"", 4},
      {"%C", "\"a`\"b\"", 4},    {"%+C", "'a'", 3},
      {"%+C", "~a~", 3},         {"%+C", "\"a\"", 3},
      {"%+C", "'a\"", -1},       {"%+C", "~a'b~", 5},
      {"%+C", "'\\''", 4},       {"%+C", " 'a'", 4},
      {"%+C", "a", -1},          {"%+C", "`a`", -1},
      {"%0C", "\"a\"", 3},       {"%0C", " \"a\"", -1},
      {"% C", "", -1},           {"% C", "   ", -1},
      {"% C", "x", -1},          {"% C", " \"\"", 3},
      {"%5C", "\"abc\"", 5},     {"%5C", "\"abcd\"", -1},
      {"%5C", "\"ab\"", -1},     {"%5C", "\"ab\" ", -1},
      {"%5C", " \"ab\"", 5},     {"%5C", "   \"\"", 5},
      {"%5C", "     ", -1},      {"%5C", "    \"\"", -1},
      {"%5C", "\"ab\\\"\"", -1}, {"%5C", "\"a\\\"\"", 5},
      {"%5C", "\"abc\\\"", -1},  {"%5C", "\"abc", -1},
      {"%2C", "\"\"", 2},        {"%1C", "\"\"", -1},
      {"%1C", "\"", -1},         {"%0C", "\"", -1},
  });
}

TEST(zxregexe, t_is_a_date) {
  expect_fields({
      {"%t", "31/12/99", 8},
      {"%t", "1-1-2057", 8},
      {"%t", "01.02.03", 8},
      {"%t", "1/1/7", 5},
      {"%t", "1/1/0", 5},
      {"%t", "1/1/99x", 6},
      {"%t", "1/1/99/", 6},
      {"%t", "1/1/99 ", 6},
      {"%t", "1/2.99", -1},
      {"%t", "1-2/99", -1},
      {"%t", "1:2:99", -1},
      {"%t", "1 2 99", -1},
      {"%t", "1,2,99", -1},
      {"%t", "", -1},
      {"%t", "1", -1},
      {"%t", "1/", -1},
      {"%t", "1/1", -1},
      {"%t", "1/1/", -1},
      {"%t", "1/1/x", -1},
      {"%t", "/1/99", -1},
      {"%t", "1//99", -1},
      {"%t", " 1/1/99", -1},
      {"%t", "1 /1/99", -1},
      {"%t", "-1/1/99", -1},
      {"%t", "1\0001\00099"sv, -1},
      {"%t", "1/1\00099"sv, -1},
      {"%t", "x", -1},
      {"%t", "31", -1},
      {"%t", "31/12", -1},
      {"%t", "1/+1/99", -1},
  });
}

TEST(zxregexe, t_has_days_and_months_of_two_digits_and_years_of_four) {
  expect_fields({
      {"%t", "01/01/0099", 10},
      {"%t", "001/1/99", -1},
      {"%t", "1/001/99", -1},
      {"%t", "1/1/00099", -1},
      {"%t", "1/1/20010", -1},
      {"%t", "111/1/99", -1},
      {"%t", "0/1/99", -1},
      {"%t", "00/1/99", -1},
      {"%t", "32/1/99", -1},
      {"%t", "99/1/99", -1},
      {"%t", "1/0/99", -1},
      {"%t", "1/00/99", -1},
      {"%t", "1/13/99", -1},
      {"%t", "1/12/99", 7},
  });
}

// The years are 0 to 57, 70 to 100 and 1970 to 2057.
TEST(zxregexe, t_knows_the_years_of_its_century) {
  const Program program("^%t");
  for (int year = 0; year <= 9999; ++year) {
    const std::string date = "1/1/" + std::to_string(year);
    const bool known = within(year, 0, 57) || within(year, 70, 100) ||
                       within(year, 1970, 2057);
    EXPECT_EQ(end_of_field(program.get(), date),
              known ? static_cast<int>(date.size()) : -1)
        << date;
  }
}

TEST(zxregexe, t_knows_the_days_of_each_month) {
  constexpr int k_days[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  const Program program("^%t");
  for (const int year :
       {0, 1, 4, 57, 72, 75, 99, 100, 1999, 2000, 2001, 2004}) {
    for (int month = 1; month <= 12; ++month) {
      const int extra = month == 2 && year % 4 == 0 ? 1 : 0;
      for (int day = 1; day <= 39; ++day) {
        const std::string date = std::to_string(day) + "." +
                                 std::to_string(month) + "." +
                                 std::to_string(year);
        const bool known = day <= k_days[month - 1] + extra;
        EXPECT_EQ(end_of_field(program.get(), date),
                  known ? static_cast<int>(date.size()) : -1)
            << date;
      }
    }
  }
}

TEST(zxregexe, fields_end_with_the_subject) {
  for (const char* field :
       {"%d", "%5d", "% +5d", "%x", "%4x", "%=x", "%f", "%5f", "%v", "%3v",
        "%s", "%3s", "%C", "%5C", "%+C", "%t"}) {
    const Program program(std::string("^") + field + "$");
    for (const std::string_view whole :
         {"  -0x12fh"sv, "  +1.25km"sv, "31/12/1999"sv, " \"a\\\"b\" "sv,
          "0x"sv, "-"sv, "+."sv}) {
      for (std::size_t start = 0; start <= whole.size(); ++start) {
        for (std::size_t size = 0; size <= whole.size() - start; ++size) {
          const std::string_view text = whole.substr(start, size);
          const std::string found = search(program.get(), text);
          if (found == "no") continue;
          EXPECT_EQ(found, "0-" + std::to_string(size)) << field;
        }
      }
    }
  }
}

// ---- the fields of the record

// "0:d1-3 2:s4-5" for two fields that are set.
std::string fields_of(std::string_view pattern, std::string_view subject) {
  const Program program(pattern);
  const std::string_view text = at_the_end_of_memory(subject);
  if (!regexec(program.get(), text.data(), text.data() + text.size()))
    return "no";
  std::string all;
  for (int i = 0; i < zxMatch::k_fields; ++i) {
    const zxMatch::Field& field = zx_match.field[i];
    EXPECT_EQ(field.type == 0, field.start == nullptr);
    EXPECT_EQ(field.type == 0, field.end == nullptr);
    if (field.type == 0) continue;
    all += (all.empty() ? "" : " ") + std::to_string(i) + ":" + field.type +
           std::to_string(field.start - text.data()) + "-" +
           std::to_string(field.end - text.data());
  }
  return all;
}

TEST(zxregexe, fields_are_recorded_by_their_order) {
  const Row rows[] = {
      {"%d", "12", "0:d0-2"},
      {"x%d,%s", "x12,ab", "0:d1-3 1:s4-6"},
      {"x%5d", "x   42", "0:d1-6"},
      {"=%x %f %v %C %t", "=ff 1.5 2k \"a\" 1/2/99",
       "0:x1-3 1:f4-7 2:v8-10 3:C11-14 4:t15-21"},
      {"% d,% s", ",", "0:d0-0 1:s1-1"},
      {"{{%dx|%d}}", "12y", "1:d0-2"},
      {"%d?x", "x", ""},
      {"%d|%s", "x", "1:s0-1"},
      {"{{%d,}}+", "1,2,", "0:d2-3"},
      {"^{{%d,}}*2,$", "1,2,", "0:d0-1"},
      {"^{{%d,}}*", "1,2", "0:d0-1"},
      {"(%d)`1", "1212", "no"},
      {"%2d%2d", "1234", "0:d0-2 1:d2-4"},
  };
  for (const Row& row : rows)
    EXPECT_EQ(fields_of(row.pattern, row.subject), row.found) << row.pattern;
}

TEST(zxregexe, all_nineteen_fields_are_recorded) {
  std::string pattern;
  std::string subject;
  for (int i = 0; i < 19; ++i) {
    pattern += "%1d";
    subject += static_cast<char>('0' + i % 10);
  }
  const Program program(pattern);
  EXPECT_EQ(search(program.get(), subject), "0-19");
  for (int i = 0; i < 19; ++i) {
    EXPECT_EQ(zx_match.field[i].type, 'd');
    EXPECT_EQ(zx_match.field[i].start - zx_match.start[0], i);
    EXPECT_EQ(zx_match.field[i].end - zx_match.start[0], i + 1);
  }
  EXPECT_EQ(zx_match.field[19].type, 0);
}

TEST(zxregexe, a_field_that_fails_is_tried_further_on) {
  EXPECT_EQ(fields_of("%d", "2147483648"), "0:d1-10");
  EXPECT_EQ(fields_of("%t", "31.04.99"), "0:t1-8");
  EXPECT_EQ(fields_of("%d", "a 5"), "0:d1-3");
}

// ---- numbers against an obvious model

struct Spec {
  char type;
  bool zero;
  bool blank;
  bool plus;
  bool equal;
  int width;  // -1: none

  std::string text() const {
    std::string all = "%";
    if (zero) all += '0';
    if (blank) all += ' ';
    if (plus) all += '+';
    if (equal) all += '=';
    if (width >= 0) all += std::to_string(width);
    return all + type;
  }
};

constexpr int k_no_match = -1;
constexpr int k_not_told = -2;

// Reads a field byte by byte.
class FieldModel {
 public:
  FieldModel(const Spec& its_spec, std::string_view its_text)
      : spec(its_spec), text(its_text) {}

  int end() {
    while (!spec.zero && here() == ' ') ++at;
    if (!more() && !spec.zero) return end_of_blanks();
    if (!more() && spec.blank && (spec.plus || spec.width >= 0))
      return k_not_told;
    if (!read_sign()) return k_no_match;
    const bool read =
        spec.type == 'f' || spec.type == 'v' ? read_real() : read_integer();
    if (!read) return k_no_match;
    if (spec.width >= 0 && at != spec.width) return k_no_match;
    return at;
  }

 private:
  int size() const { return static_cast<int>(text.size()); }

  // Whether there is a byte left of subject and width.
  bool more() const {
    return at < size() && (spec.width < 0 || at < spec.width);
  }
  int here() const { return more() ? text[static_cast<std::size_t>(at)] : -1; }

  // Whether a field that must have a sign may be empty, and whether the
  // subject may end ahead of the width, is not promised.
  int end_of_blanks() const {
    if (!spec.blank) return k_no_match;
    const bool is_told = spec.width >= 0 ? at == spec.width : !spec.plus;
    return is_told ? at : k_not_told;
  }

  bool read_sign() {
    if (here() != '+' && here() != '-') return !spec.plus;
    ++at;
    has_sign = true;
    return !spec.equal && at != spec.width;
  }

  bool read_prefix() {
    const bool prefix = spec.type == 'x' && here() == '0' && at + 2 < size() &&
                        (text[static_cast<std::size_t>(at) + 1] | 32) == 'x' &&
                        (spec.width < 0 || at + 2 < spec.width);
    if (prefix) at += 2;
    return prefix;
  }

  bool read_integer() {
    const bool prefix = read_prefix();
    const char* const digits =
        spec.type == 'x' ? "0123456789abcdefABCDEF" : "0123456789";
    int count = 0;
    for (; here() > 0 && std::strchr(digits, here()) != nullptr; ++at) ++count;
    if (count == 0) return spec.blank && !has_sign && !prefix;
    if (spec.type == 'x' && !prefix && (here() | 32) == 'h') ++at;
    return true;
  }

  bool read_real() {
    int digits = 0;
    int points = 0;
    for (; is_digit(here()) || (here() == '.' && points == 0); ++at)
      ++(here() == '.' ? points : digits);
    if (digits == 0) return spec.blank && !has_sign && points == 0;
    if (spec.type == 'v' && (here() == 'k' || here() == 'm')) ++at;
    return true;
  }

  const Spec spec;
  const std::string_view text;
  int at = 0;
  bool has_sign = false;
};

std::vector<Spec> all_specs(std::string_view types, int max_width) {
  std::vector<Spec> specs;
  for (const char type : types) {
    for (unsigned flags = 0; flags < 16; ++flags) {
      for (int width = -1; width <= max_width; ++width) {
        if (width == 0) continue;
        specs.push_back({type, (flags & 1) != 0, (flags & 2) != 0,
                         (flags & 4) != 0, (flags & 8) != 0, width});
      }
    }
  }
  return specs;
}

// Calls `run` with every text of up to `longest` bytes of an alphabet.
void for_all_texts(std::string_view alphabet, std::size_t longest,
                   const std::function<void(const std::string&)>& run) {
  std::string text;
  const std::function<void()> extend = [&] {
    run(text);
    if (text.size() == longest) return;
    for (const char c : alphabet) {
      text += c;
      extend();
      text.pop_back();
    }
  };
  extend();
}

void expect_the_model(std::string_view types, std::string_view alphabet,
                      std::size_t longest) {
  const std::vector<Spec> specs =
      all_specs(types, static_cast<int>(longest) + 1);
  std::vector<zxRegex*> programs;
  for (const Spec& spec : specs) {
    const std::string pattern = "^" + spec.text();
    programs.push_back(
        regcomp(pattern.data(), pattern.data() + pattern.size()));
    ASSERT_NE(programs.back(), nullptr) << pattern;
  }
  int differences = 0;
  for_all_texts(alphabet, longest, [&](const std::string& bytes) {
    const std::string_view text = at_the_end_of_memory(bytes);
    for (std::size_t i = 0; i < specs.size(); ++i) {
      const int expected = FieldModel(specs[i], text).end();
      if (expected == k_not_told) continue;
      int end = k_no_match;
      if (regexec(programs[i], text.data(), text.data() + text.size()))
        end = static_cast<int>(zx_match.end[0] - text.data());
      if (end == expected || ++differences > 20) continue;
      ADD_FAILURE() << specs[i].text() << " on " << shown(text) << ": " << end
                    << ", not " << expected;
    }
  });
  EXPECT_EQ(differences, 0);
  for (zxRegex* program : programs) zx_realloc(program, 0);
}

TEST(zxregexe, integers_agree_with_the_model) {
  expect_the_model("dx", " +-09afxXhH", 4);
}

TEST(zxregexe, reals_agree_with_the_model) {
  // A suffix behind no digits is the one case that `% v` leaves open.
  expect_the_model("f", " +-.09km", 4);
  expect_the_model("v", " +-.09x", 4);
}

TEST(zxregexe_slow, long_integers_agree_with_the_model) {
  expect_the_model("dx", " +-09afxXhH", 5);
}

// ---- what stands in the record

bool is_clear() {
  for (int slot = 0; slot < zxMatch::k_slots; ++slot) {
    if (zx_match.start[slot] != nullptr || zx_match.end[slot] != nullptr ||
        zx_match.alternative[slot] != 0)
      return false;
  }
  return std::all_of(std::begin(zx_match.field), std::end(zx_match.field),
                     [](const zxMatch::Field& field) {
                       return field.type == 0 && field.start == nullptr &&
                              field.end == nullptr;
                     });
}

// Leaves a match with a group, a counter and a field.
void leave_a_match() {
  EXPECT_EQ(search("(a|b)%d", "xb12"), "1-4 1:1-2");
  EXPECT_EQ(zx_match.alternative[1], 2);
  EXPECT_EQ(zx_match.field[0].type, 'd');
}

TEST(zxregexe, a_run_without_a_match_clears_groups_and_fields) {
  for (const char* pattern : {"q", "^.q", "(q)", "[q]", "a*q|z", "$q", "q%d"}) {
    leave_a_match();
    EXPECT_EQ(search(pattern, "abc"), "no") << pattern;
    for (int slot = 0; slot < zxMatch::k_slots; ++slot) {
      EXPECT_EQ(zx_match.start[slot], nullptr) << pattern;
      EXPECT_EQ(zx_match.end[slot], nullptr) << pattern;
    }
    for (const zxMatch::Field& field : zx_match.field)
      EXPECT_EQ(field.type, 0) << pattern;
  }
}

TEST(zxregexe, a_match_clears_what_the_one_before_it_left) {
  leave_a_match();
  EXPECT_EQ(search("c", "c"), "0-1");
  EXPECT_EQ(zx_match.alternative[1], 0);
  EXPECT_EQ(zx_match.field[0].type, 0);
  EXPECT_EQ(zx_match.field[0].start, nullptr);
}

// Rejected by the literal it must contain, or by its first byte behind "^".
TEST(zxregexe, a_rejected_run_leaves_the_former_results) {
  for (const char* pattern : {".*foo", "x?foo", "^q", "^qrs"}) {
    leave_a_match();
    const zxMatch before = zx_match;
    EXPECT_EQ(search(pattern, "xb12"), "no");
    EXPECT_EQ(std::memcmp(before.start, zx_match.start, sizeof before.start),
              0);
    EXPECT_EQ(std::memcmp(before.end, zx_match.end, sizeof before.end), 0);
    EXPECT_EQ(before.alternative[1], zx_match.alternative[1]);
    EXPECT_EQ(before.field[0].type, zx_match.field[0].type);
    EXPECT_EQ(before.field[0].start, zx_match.field[0].start);
    EXPECT_EQ(before.field[0].end, zx_match.field[0].end);
  }
}

TEST(zxregexe, a_cleared_record_holds_nothing) {
  leave_a_match();
  clear_match();
  EXPECT_TRUE(is_clear());
}

// ---- failures

TEST(zxregexe, a_null_program_or_subject_is_a_failure) {
  const Program program("a");
  const zxRegex* const regex = program.get();
  static const char text[] = "a";
  const std::string message = "1753: regexec: bad args";
  EXPECT_FAILURE(regexec(nullptr, text, text + 1), message, line_of(1753, ""));
  EXPECT_FAILURE(regexec(regex, nullptr, nullptr), message, line_of(1753, ""));
  EXPECT_FAILURE(regexec_from(nullptr, text, text + 1, 'a'), message,
                 line_of(1753, ""));
  EXPECT_FAILURE(regexec_from(regex, nullptr, nullptr, 'a'), message,
                 line_of(1753, ""));
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(regexec(nullptr, text, text + 1));
    EXPECT_FALSE(regexec(regex, nullptr, nullptr));
    EXPECT_FALSE(regexec_from(nullptr, text, text + 1, 'a'));
    EXPECT_FALSE(regexec_from(regex, nullptr, nullptr, 'a'));
  });
}

TEST(zxregexe, a_program_without_its_magic_byte_is_a_failure) {
  const Program program("a");
  static const char text[] = "a";
  program.get()->magic = 155;
  EXPECT_FAILURE(regexec(program.get(), text, text + 1),
                 "1754: regexec: bad reg", line_of(1754, ""));
  EXPECT_FAILURE(regexec_from(program.get(), text, text + 1, 'b'),
                 "1754: regexec: bad reg", line_of(1754, ""));
  kit::with_failures_dropped(
      [&] { EXPECT_FALSE(regexec(program.get(), text, text + 1)); });
  program.get()->magic = k_regex_magic;
  EXPECT_TRUE(regexec(program.get(), text, text + 1));
}

TEST(zxregexe, an_end_ahead_of_the_subject_fails_an_assertion) {
  const Program program("a");
  static const char text[] = "aa";
  EXPECT_ASSERTION(regexec(program.get(), text + 1, text), "zxregexe");
  EXPECT_ASSERTION(regexec_from(program.get(), text + 1, text, 'a'),
                   "zxregexe");
  kit::with_failures_dropped(
      [&] { EXPECT_FALSE(regexec(program.get(), text + 1, text)); });
}

// ---- long subjects

constexpr std::size_t k_megabyte = 1000000;

std::string letters(std::size_t count) {
  std::string text(count, 'a');
  for (std::size_t i = 1; i < count; i += 2) text[i] = 'b';
  return text;
}

// Each outcome for a subject of that many letters.
void expect_long_matches(std::size_t count) {
  const std::string text = letters(count) + "c";
  const std::string size = std::to_string(count);
  const std::string all = std::to_string(count + 1);
  const std::string last = std::to_string(count - 1) + "-" + size;
  const auto find = [&text](const char* pattern, std::size_t length) {
    const Program program(pattern);
    if (!regexec(program.get(), text.data(), text.data() + length))
      return std::string("no");
    return match_as_text(std::string_view(text).substr(0, length));
  };
  EXPECT_EQ(find("(a|b)*c", count + 1), "0-" + all + " 1:" + last);
  EXPECT_EQ(find("^(a|b)*c", count), "no");
  EXPECT_EQ(find("(.|x)*", count + 1), "0-" + all + " 1:" + size + "-" + all);
  EXPECT_EQ(find("({{a|b}})+", count), "0-" + size + " 1:" + last);
  EXPECT_EQ(find("({{a|b}}+)", count), "0-" + size + " 1:0-" + size);
  EXPECT_EQ(find("{{a|b}}*", count), "0-" + size);
  EXPECT_EQ(find("{{ab}}*c", count + 1), "0-" + all);
  EXPECT_EQ(find("^.*?c$", count + 1), "0-" + all);
  EXPECT_EQ(find("[ab]*d", count + 1), "no");
}

TEST(zxregexe, a_megabyte_is_matched_by_groups_in_loops) {
  expect_long_matches(k_megabyte);
}

#ifdef __SANITIZE_ADDRESS__
constexpr bool k_is_sanitized = true;
#else
constexpr bool k_is_sanitized = false;
#endif
constexpr bool k_is_narrow = sizeof(void*) == 4;

TEST(zxregexe_slow, a_hundred_megabytes_are_matched_by_groups_in_loops) {
  if (k_is_narrow) GTEST_SKIP() << "the choices do not fit 32 bits";
  if (k_is_sanitized) GTEST_SKIP() << "the sanitizer has no room for it";
  expect_long_matches(100 * k_megabyte);
}

ZX_CASE(matches_a_hundred_megabytes) {
  kit::start();
  const std::string text = letters(100 * k_megabyte) + "d";
  const Program program("^(a|b)*c");
  kit::say(regexec(program.get(), text.data(), text.data() + text.size())
               ? "match"
               : "none");
  return 0;
}

TEST(zxregexe_slow, a_subject_beyond_all_memory_is_a_failure) {
  if (!k_is_narrow) GTEST_SKIP() << "there is memory enough";
  const kit::Outcome outcome = kit::outcome_of("matches_a_hundred_megabytes");
  EXPECT_EQ(outcome.process.exit_code, 100);
  EXPECT_NE(outcome.process.out.find("Fatal Error 2000: malloc: out of mem"),
            std::string::npos)
      << outcome.process.out;
}

// ---- memory

// While one lives, memory is counted, and there is none beyond a limit.
class Memory {
 public:
  explicit Memory(std::size_t limit = static_cast<std::size_t>(-1)) {
    most = limit;
    live = 0;
    peak = 0;
    sizes.clear();
    zx_realloc = take;
  }
  Memory(const Memory&) = delete;
  Memory& operator=(const Memory&) = delete;
  ~Memory() { zx_realloc = before; }

  static inline std::size_t live = 0;
  static inline std::size_t peak = 0;

 private:
  static void* take(void* block, std::size_t size) {
    const auto known = sizes.find(block);
    const std::size_t before = known == sizes.end() ? 0 : known->second;
    if (live - before + size > most) {
      bail_code(2000);
      return nullptr;
    }
    void* const result = zx_heap_realloc(block, size);
    sizes.erase(block);
    if (result != nullptr) sizes[result] = size;
    live = live - before + size;
    peak = std::max(peak, live);
    return result;
  }

  const zxReallocFunction before = zx_realloc;
  static inline std::size_t most = 0;
  static inline std::unordered_map<void*, std::size_t> sizes;
};

constexpr std::size_t k_kept = 65536;

TEST(zxregexe, the_memory_of_a_long_run_is_given_back) {
  const std::string text = letters(k_megabyte) + "x";
  const Program program("^(a|b)*[bc]$");
  const Memory memory;
  EXPECT_FALSE(regexec(program.get(), text.data(), text.data() + text.size()));
  EXPECT_GT(Memory::peak, k_megabyte);
  EXPECT_LE(Memory::live, k_kept);
}

TEST(zxregexe, the_memory_of_a_pathological_run_has_a_limit) {
  const std::string text = std::string(400, 'a') + "b";
  const Program program("^(a|aa)+$");
  const Memory memory;
  EXPECT_FALSE(regexec(program.get(), text.data(), text.data() + text.size()));
  EXPECT_LE(Memory::peak, std::size_t{70} * 1024 * 1024);
  EXPECT_LE(Memory::live, k_kept);
}

TEST(zxregexe, a_simple_repetition_needs_no_more_memory_for_more_bytes) {
  const std::string text = letters(k_megabyte);
  for (const char* pattern : {"^.*$", "^([ab]*)$", "(.*)(.*)", "^.*?(.*)"}) {
    const Program program(pattern);
    const Memory memory;
    EXPECT_TRUE(regexec(program.get(), text.data(), text.data() + text.size()));
    EXPECT_LE(Memory::peak, k_kept) << pattern;
  }
}

// Where a byte leaves a loop no choice, nothing has to be kept.
TEST(zxregexe, a_loop_without_a_choice_needs_no_more_memory_for_more_bytes) {
  const std::string text = letters(k_megabyte) + "c";
  for (const char* pattern : {"^(a|b)*c", "^{{a|b}}+c$"}) {
    const Program program(pattern);
    const Memory memory;
    regexec(program.get(), text.data(), text.data() + text.size());
    EXPECT_LE(Memory::peak, k_kept) << pattern;
  }
}

TEST(zxregexe, a_run_without_memory_fails) {
  const std::string text = letters(k_megabyte) + "x";
  const Program program("^(a|b)*[bc]$");
  {
    const Memory memory(k_megabyte);
    kit::with_failures_dropped([&] {
      EXPECT_FALSE(
          regexec(program.get(), text.data(), text.data() + text.size()));
    });
  }
  EXPECT_EQ(search("(a|b)*c", "abc"), "0-3 1:1-2");
  {
    const Memory memory(k_megabyte);
    EXPECT_FAILURE(
        regexec(program.get(), text.data(), text.data() + text.size()),
        "2000: malloc: out of mem", line_of(2000, ""));
  }
  EXPECT_EQ(search("(a|b)*c", "abc"), "0-3 1:1-2");
}

// ---- patterns whose time could grow out of all proportion

// Seconds that a search takes.
double seconds_of(const std::function<void()>& run) {
  const auto start = std::chrono::steady_clock::now();
  run();
  return std::chrono::duration<double>(std::chrono::steady_clock::now() - start)
      .count();
}

constexpr const char* k_pathological[] = {
    "^(a|aa)+$",   "^{{a|aa}}+$",      "^((a|aa)(a|aa))*$", "^(a+)+$",
    "^((a+)+)+$",  "^(a*a*a*a)*$",     "^(a|a|a)*$",        "^(a?a?a?a)+$",
    "^(a|ab|b)*c", "^(.*.())*(.*)`dz",
};

// Names each pattern once it has ended.
ZX_CASE(runs_pathological_patterns) {
  kit::start();
  const std::string subject(static_cast<std::size_t>(std::atoi(argv[1])), 'a');
  for (const char* pattern : k_pathological)
    kit::say(pattern + (" " + search(pattern, subject + "b") + "\n"));
  return 0;
}

// In a process of its own, since without care the end would never come.
// However often a run has gone back, an empty subject may still match.
TEST(zxregexe, an_empty_subject_is_matched_behind_hundreds_of_tries) {
  std::string ends = "$";
  for (int i = 0; i < 300; ++i) ends += "|$";
  EXPECT_EQ(search("{{" + ends + "}}a|", ""), "0-0");
  EXPECT_EQ(search("^{{" + ends + "}}a|^", ""), "0-0");
  EXPECT_EQ(search("{{{{" + ends + "}}a}}?", ""), "0-0");
  EXPECT_EQ(search("{{" + ends + "}}a", ""), "no");
}

TEST(zxregexe, pathological_patterns_end_soon) {
  std::string expected;
  for (const char* pattern : k_pathological)
    expected += std::string(pattern) + " no\n";
  for (const char* count : {"40", "300"}) {
    kit::ProcessOptions options;
    options.limit = std::chrono::seconds(10);
    const kit::ProcessResult result =
        kit::run_case("runs_pathological_patterns", {count}, options);
    EXPECT_FALSE(result.timed_out);
    EXPECT_EQ(result.out, expected) << count;
  }
}

TEST(zxregexe, four_repetitions_of_any_byte_end_soon) {
  const std::string subject(300, 'a');
  EXPECT_LT(seconds_of([&] {
              EXPECT_EQ(search("^(.*)(.*)(.*)(.*)`d", subject), "no");
            }),
            1.0);
  EXPECT_LT(seconds_of([&] {
              EXPECT_EQ(search("^(.*)(.*)(.*)(.*)`d", subject + "5"),
                        "0-301 1:0-300 2:300-300 3:300-300 4:300-300");
            }),
            1.0);
}

// A pathological part ahead of a way that matches in the end.
TEST(zxregexe, a_pathological_pattern_still_finds_its_match) {
  const std::string subject = std::string(60, 'a') + "b";
  EXPECT_EQ(search("^{{(a|aa)+$|(a*)b}}", subject), "0-61 2:0-60");
  EXPECT_EQ(search("^((a|aa)+c|(a|aa)+b)", subject), "0-61 1:0-61 3:59-60");
  EXPECT_EQ(search("^(a|aa)+b", subject), "0-61 1:59-60");
  EXPECT_EQ(counters("{{(a|aa)+$|a*b}}", subject), "0=2");
}

}  // namespace
