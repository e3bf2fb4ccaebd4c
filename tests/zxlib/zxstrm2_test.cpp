// zxstrm2_test.cpp - replacing by patterns: the language of replacements, how
// the search goes on, strings that are subject and argument at once, a slow
// model; cutting pieces off.
// Tests zxlib/zxstrm2.h and zxstrm2.cpp.
#include "zxstrm2.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <climits>
#include <cstdint>
#include <functional>
#include <initializer_list>
#include <ostream>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "kit/failure.h"
#include "kit/text.h"

namespace {

using namespace std::string_literals;
using namespace std::string_view_literals;
using Texts = std::vector<std::string>;

using kit::text_of;

std::string group(std::int32_t n) { return text_of(group_text(n)); }

using kit::str;

// All matches replaced; texts are taken by contents.
std::string replaced(std::string_view subject, std::string_view pattern,
                     std::string_view replacement) {
  zxStr text = str(subject);
  const bool any = replace_all(text, str(pattern), str(replacement));
  EXPECT_EQ(any, match(str(subject), str(pattern)));
  return text_of(text);
}

struct ReplacedRow {
  std::string_view pattern;
  std::string_view subject;
  std::string_view replacement;
  std::string_view result;
};

void expect_replaced(std::initializer_list<ReplacedRow> rows) {
  for (const ReplacedRow& row : rows)
    EXPECT_EQ(replaced(row.subject, row.pattern, row.replacement), row.result)
        << row.pattern << " on " << row.subject << " by " << row.replacement;
}

// What replace_n made of a subject, and its result.
struct Replaced {
  std::string text;
  std::int32_t count;

  bool operator==(const Replaced&) const = default;
};

std::ostream& operator<<(std::ostream& out, const Replaced& replaced) {
  return out << testing::PrintToString(replaced.text) << ", " << replaced.count;
}

Replaced replaced_n(std::string_view subject, std::string_view pattern,
                    std::string_view replacement, std::int32_t count) {
  zxStr text = str(subject);
  forget(pattern.data());
  const std::int32_t n =
      replace_n(text, pattern.data(), zx_count(pattern.size()),
                replacement.data(), zx_count(replacement.size()), count);
  forget(pattern.data());
  return {text_of(text), n};
}

// -------------------------------------------- the language of replacements

TEST(zxstrm2, a_replacement_is_text_with_escapes) {
  const struct {
    std::string_view replacement;
    std::string_view result;
  } rows[] = {
      {"", ""},
      {"xyz", "xyz"},
      {"$1 & %d (*) [.] {{}}", "$1 & %d (*) [.] {{}}"},
      {"a\0b"sv, "a\0b"sv},
      // Escaped letters, with the back quote and with the backslash.
      {"`a`b`f`n`r`t", "\a\b\f\n\r\t"},
      {"\\a\\b\\f\\n\\r\\t", "\a\b\f\n\r\t"},
      {"`A`d`h`q`s`w`x", "Adhqswx"},
      {"``", "`"},
      {"\\\\", "\\"},
      {"`\\", "\\"},
      {"\\`", "`"},
      {"`|", "|"},
      {"`-`.`(`$", "-.($"},
      {"`\0"sv, "\0"sv},
      {"`\xE0", "\xE0"},
      // Bytes as octal numbers take three digits.
      {"`101", "A"},
      {"\\101", "A"},
      {"`0601", "01"},
      {"`000", "\0"sv},
      {"`377", "\xFF"},
      {"`101`102", "AB"},
      {"<`012>", "<\n>"},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(replaced("<m>", "m", row.replacement),
              "<" + std::string(row.result) + ">")
        << testing::PrintToString(std::string(row.replacement));
  }
}

TEST(zxstrm2, a_digit_stands_for_a_group) {
  expect_replaced({
      {"b", "abc", "[`0]", "a[b]c"},
      {"b", "abc", "[\\0]", "a[b]c"},
      {"(a)(b)", "-ab-", "`2`1", "-ba-"},
      {"(a)(b)", "-ab-", "\\2\\1", "-ba-"},
      {"((a)(b))", "ab", "`1`2`3", "abab"},
      {"(1)(2)(3)(4)(5)(6)(7)(8)(9)", "123456789", "`9`8`7`6`5`4`3`2`1",
       "987654321"},
      {"(`w+)=(`w+)", "a=1,b=2", "`2=`1", "1=a,2=b"},
      // Fewer than three digits are a group and text.
      {"(a)", "a", "`12", "a2"},
      {"(a)", "a", "`1x23", "ax23"},
      {"(a)", "a", "`1`1", "aa"},
      {"(a)", "a", "`12x3", "a2x3"},
      // Groups that took no part, and those that the pattern does not have.
      {"(x)?b", "b", "<`1>", "<>"},
      {"b", "b", "<`1`9>", "<>"},
      {"(a)b", "aab", "`1`1", "aaa"},
      {"(a|b)+", "-ab-", "`1", "-b-"},
      {"()b", "ab", "<`1>", "a<>"},
      // What a group holds is not read again.
      {"(.)", "`0|", "`1`1", "``00||"},
  });
}

TEST(zxstrm2, a_replacement_is_read_within_its_length) {
  const struct {
    std::string_view replacement;
    std::int32_t length;
    std::string_view result;
  } rows[] = {
      {"`101", 3, "m0"},  // group 1 and 0
      {"`1012", 4, "A"},  {"`12", 2, "m"},   {"xyz|", 2, "xy"},
      {"xyz", 0, ""},     {"x`1", 2, "x`"},  // nothing stands behind the escape
      {"x\\n", 2, "x\\"}, {"x``n", 3, "x`"}, {"`", 1, "`"},
  };
  for (const auto& row : rows) {
    zxStr subject("<m>");
    EXPECT_EQ(
        replace_n(subject, "(m)", 3, row.replacement.data(), row.length, 1), 1);
    EXPECT_EQ(text_of(subject), "<" + std::string(row.result) + ">")
        << row.replacement << ", " << row.length;
  }
}

TEST(zxstrm2, a_bar_separates_alternatives) {
  expect_replaced({
      {"a|b", "a", "one|two", "one"},
      {"a|b", "b", "one|two", "two"},
      {"a|b", "-a-b-", "one|two", "-one-two-"},
      {"a|b|c", "cba", "x|y|z", "zyx"},
      // Fewer alternatives than the pattern has: the last one serves.
      {"a|b|c", "abc", "x|y", "xyy"},
      {"a|b|c", "abc", "x", "xxx"},
      {"a|b", "ab", "", ""},
      // More of them: never reached.
      {"a|b", "ab", "x|y|z", "xy"},
      // Empty ones.
      {"a|b", "<ab>", "|y", "<y>"},
      {"a|b", "<ab>", "x|", "<x>"},
      {"a|b|c", "<abc>", "x||z", "<xz>"},
      // Groups and escapes within alternatives.
      {"a|b", "ab", "`0|<`0>", "a<b>"},
      {"(a)|(b)", "ba", "1`1|2`2", "2b1a"},
      {"a|b", "ab", "x`|y|z", "x|yz"},
      {"a|b", "ab", "x`174y|z", "x|yz"},
      {"a|b", "ab", "x\\|y|z", "x|yz"},
      // The choice of a {{ }} group is one of the top level.
      {"{{a|b}}c", "acbc", "x|y", "xy"},
      // So is an optional part, and a repeated one.
      {"colou?r", "color colour", "one|two", "two one"},
      {"a{{bc}}*d", "ad abcd", "x|y", "y y"},
      // Without a choice at the top level the bar is a byte.
      {"a", "a", "one|two", "one|two"},
      {"(a|b)", "ab", "x|y", "x|yx|y"},
      {"(colou?r)", "color", "x|y", "x|y"},
      {"a*b{1,2}", "ab", "x|y", "x|y"},
      {"", "a", "|", "|a"},
  });
}

// ------------------------------------------------------ how the search goes

TEST(zxstrm2, all_matches_are_replaced_from_left_to_right) {
  expect_replaced({
      {"b", "abcabc", "", "acac"},
      {"b", "abcabc", "XYZ", "aXYZcaXYZc"},
      {"aa", "aaaaa", "x", "xxa"},
      {"a+", "aabaa", "x", "xbx"},
      {"[0-9]+", "1 22 333", "#", "# # #"},
      {".", "a\nb", "x", "xxx"},
      {"`n", "a\nb\n", "`r`n", "a\r\nb\r\n"},
      {"`0", "a\0b"sv, "-", "a-b"},
      {"%d", "1, -2, x", "<`0>", "<1>,< -2>, x"},
      // Replaced text is not searched.
      {"a", "aa", "aa", "aaaa"},
      {"ab", "aabb", "", "ab"},
      // Empty matches: one at a place, none behind a match, none at the end
      // of a text that has been passed over.
      {"a*", "baaa", "x", "xbx"},
      {"a*", "bb", "x", "xbxb"},
      {"a*", "ab", "x", "xb"},
      {"a*", "aba", "x", "xbx"},
      {"a*", "", "x", "x"},
      {"x*", "abc", "-", "-a-b-c"},
      {"", "abc", "-", "-a-b-c"},
      {"b*?", "bb", "-", "-b-b"},
      // The start is a place of its own, reached once.
      {"^", "aaa", "x", "xaaa"},
      {"^a", "aaa", "x", "xaa"},
      {"^|b", "bb", "1|2", "122"},
      {"^a|b", "aab", "x", "xax"},
      {"^a*", "aab", "x", "xb"},
      // The end.
      {"$", "abc", "x", "abcx"},
      {"$", "", "x", "x"},
      {"c$", "cc", "x", "cx"},
      {"a|$", "ba", "x|y", "bx"},
      {"b|$", "ba", "x|y", "xay"},
      // Boundaries look at the byte ahead of the place.
      {"`bfoo", "foofoo", "X", "Xfoo"},
      {"`bfoo", "foo foo-foo", "X", "X X-X"},
      {"`Ba", "aaa", "x", "axx"},
      {"`b", "ab", "|", "|ab|"},
      {"`b", "ab cd", "-", "-ab- -cd-"},
      {"`b`w", "ab cd", "x", "xb xd"},
      {"`B", "ab", "-", "a-b"},
  });
}

TEST(zxstrm2, the_count_limits_the_searches) {
  const struct {
    std::string_view pattern;
    std::string_view subject;
    std::int32_t count;
    Replaced result;
  } rows[] = {
      {"a", "aaaa", 1, {"xaaa", 1}},
      {"a", "aaaa", 2, {"xxaa", 2}},
      {"a", "aaaa", 4, {"xxxx", 4}},
      {"a", "aaaa", 5, {"xxxx", 4}},
      {"a", "-a-a-", INT_MAX, {"-x-x-", 2}},
      {"a", "bbb", 3, {"bbb", 0}},
      {"a", "", 3, {"", 0}},
      {"a*", "", 3, {"x", 1}},
      // Passing over a byte is a search as well.
      {"a*", "baaa", 1, {"xbaaa", 1}},
      {"a*", "baaa", 2, {"xbaaa", 1}},
      {"a*", "baaa", 3, {"xbx", 2}},
      {"a*", "bbb", 3, {"xbxbb", 2}},
      {"a*", "bbb", 4, {"xbxbb", 2}},
      {"a*", "bbb", 5, {"xbxbxb", 3}},
      {"a*", "bbb", INT_MAX, {"xbxbxb", 3}},
      {"a*", "aab", 2, {"xb", 1}},
  };
  for (const auto& row : rows)
    EXPECT_EQ(replaced_n(row.subject, row.pattern, "x", row.count), row.result)
        << row.pattern << " on " << row.subject << ", " << row.count;
}

TEST(zxstrm2, texts_come_in_three_forms) {
  static const char k_pattern[] = "abc";
  static const char k_replacement[] = "xyz";
  zxStr text("abcabc");
  EXPECT_TRUE(replace1(text, k_pattern, k_replacement));
  EXPECT_EQ(text_of(text), "xyzabc");
  EXPECT_TRUE(replace_all(text, k_pattern, k_replacement));
  EXPECT_EQ(text_of(text), "xyzxyz");

  forget(k_pattern);
  text = "abcabc";
  EXPECT_TRUE(replace1(text, k_pattern, 2, k_replacement, 1));
  EXPECT_EQ(text_of(text), "xcabc");
  EXPECT_TRUE(replace_all(text, k_pattern, 2, k_replacement, 1));
  EXPECT_EQ(text_of(text), "xcxc");
  forget(k_pattern);

  text = str("a\0ba\0b"sv);
  EXPECT_TRUE(replace1(text, str("a\0b"sv), str("x\0"sv)));
  EXPECT_EQ(text_of(text), "x\0a\0b"s);
  EXPECT_TRUE(replace_all(text, str("`000"), zxStr("--")));
  EXPECT_EQ(text_of(text), "x--a--b");
}

TEST(zxstrm2, only_the_first_match_is_replaced_by_replace1) {
  const struct {
    std::string_view pattern;
    std::string_view subject;
    std::string_view result;
  } rows[] = {
      {"a", "baa", "bxa"}, {"a+", "baa", "bx"}, {"", "ab", "xab"},
      {"$", "ab", "abx"},  {"^", "ab", "xab"},  {"a*", "baa", "xbaa"},
  };
  for (const auto& row : rows) {
    zxStr text = str(row.subject);
    EXPECT_TRUE(replace1(text, str(row.pattern), zxStr("x")));
    EXPECT_EQ(text_of(text), row.result) << row.pattern;
  }
  zxStr text("abc");
  EXPECT_FALSE(replace1(text, "x", "y"));
  EXPECT_EQ(text_of(text), "abc");
}

TEST(zxstrm2, what_replace1_replaced_can_be_read) {
  zxStr text("key=value");
  ASSERT_TRUE(replace1(text, "(e)(y)", "<`2`1>"));
  EXPECT_EQ(text_of(text), "k<ye>=value");
  EXPECT_EQ(group(0), "ey");
  EXPECT_EQ(group(1), "e");
  EXPECT_EQ(group(10), "k");
  EXPECT_EQ(group(11), "=value");
}

TEST(zxstrm2, string_patterns_may_change_in_place) {
  zxStr text("aabb");
  zxStr pattern("a");
  const char* const address = pattern.c_str();
  EXPECT_TRUE(replace_all(text, pattern, zxStr("x")));
  pattern.at(0) = 'b';
  ASSERT_EQ(pattern.c_str(), address);
  EXPECT_TRUE(replace1(text, pattern, zxStr("y")));
  EXPECT_EQ(text_of(text), "xxyb");
  pattern.at(0) = 'x';
  EXPECT_TRUE(replace_all(text, pattern, zxStr("z")));
  EXPECT_EQ(text_of(text), "zzyb");
}

// ------------------------------------------------- the subject and sharing

TEST(zxstrm2, without_a_match_the_subject_stays_shared) {
  const zxStr original("abc");
  zxStr text = original;
  EXPECT_FALSE(replace_all(text, "x", "y"));
  EXPECT_FALSE(replace1(text, "^b", "y"));
  EXPECT_FALSE(replace_all(text, zxStr("a*x"), zxStr("y")));
  EXPECT_EQ(text_of(text), "abc");
  EXPECT_EQ(text.representation(), original.representation());
}

TEST(zxstrm2, other_holders_keep_the_old_text) {
  const zxStr original("abc");
  zxStr text = original;
  EXPECT_TRUE(replace_all(text, "b", "x"));
  EXPECT_EQ(text_of(text), "axc");
  EXPECT_EQ(text_of(original), "abc");
}

TEST(zxstrm2, a_subject_with_room_inside_is_replaced_in) {
  zxIStr text("abcabc");
  EXPECT_TRUE(replace_all(text, "b", "xyz"));
  EXPECT_EQ(text_of(text), "axyzcaxyzc");
  EXPECT_TRUE(replace_all(text, "a|c", "-"));
  EXPECT_EQ(text_of(text), "-xyz--xyz-");
}

TEST(zxstrm2, the_subject_can_be_its_own_pattern) {
  zxStr text("a+b");
  EXPECT_FALSE(replace_all(text, text, zxStr("x")));
  EXPECT_EQ(text_of(text), "a+b");
  text = "a*";
  EXPECT_TRUE(replace_all(text, text, zxStr("x")));
  EXPECT_EQ(text_of(text), "x*");
  text = "abc";
  EXPECT_TRUE(replace1(text, text, zxStr("x`0x")));
  EXPECT_EQ(text_of(text), "xabcx");
}

TEST(zxstrm2, the_subject_can_be_its_own_replacement) {
  zxStr text("aba");
  EXPECT_TRUE(replace_all(text, zxStr("a"), text));
  EXPECT_EQ(text_of(text), "abababa");
  EXPECT_TRUE(replace1(text, zxStr("^.*$"), text));
  EXPECT_EQ(text_of(text), "abababa");
  EXPECT_TRUE(replace1(text, text, text));
  EXPECT_EQ(text_of(text), "abababa");

  text = "-`0-";
  EXPECT_TRUE(replace_all(text, "`-", text.c_str()));
  EXPECT_EQ(text_of(text), "---`0---");
}

TEST(zxstrm2, a_group_can_be_the_replacement) {
  zxStr text("one two");
  ASSERT_TRUE(match(text, "two"));
  EXPECT_TRUE(replace1(text, zxStr("one"), group_text(0)));
  EXPECT_EQ(text_of(text), "two two");
}

// -------------------------------------------------------------- failures

TEST(zxstrm2, a_bad_pattern_is_message_1752_and_changes_nothing) {
  zxStr text("abc");
  zxStr piece("former");
  const std::string message = "1752: regcomp: bad reg '(b'";
  const std::string line = kit::line_of(1752, "(b");
  EXPECT_FAILURE(replace1(text, "(b", "x"), message, line);
  EXPECT_FAILURE(replace_all(text, "(b", "x"), message, line);
  EXPECT_FAILURE(replace_n(text, "(bc)", 2, "x", 1, 1), message, line);
  EXPECT_FAILURE(cut_first(text, piece, "(b"), message, line);
  EXPECT_FAILURE(cut_next(text, piece, "(b"), message, line);
  EXPECT_EQ(text_of(text), "abc");
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(replace1(text, "(b", "x"));
    EXPECT_FALSE(replace_all(text, zxStr("(b"), zxStr("x")));
    EXPECT_EQ(replace_n(text, "(bc)", 2, "x", 1, 1), 0);
  });
  EXPECT_EQ(text_of(text), "abc");
}

TEST(zxstrm2, replace_n_asserts_its_arguments) {
  zxStr text("abc");
  const char* const none = nullptr;
  const std::vector<std::function<std::int32_t()>> statements = {
      [&] { return replace_n(text, none, 1, "x", 1, 1); },
      [&] { return replace_n(text, none, 0, "x", 1, 1); },
      [&] { return replace_n(text, "b", 1, none, 0, 1); },
      [&] { return replace_n(text, "b", -1, "x", 1, 1); },
      [&] { return replace_n(text, "b", 1, "x", -1, 1); },
      [&] { return replace_n(text, "b", INT_MIN, "x", 1, 1); },
      [&] { return replace_n(text, "b", 1, "x", 1, 0); },
      [&] { return replace_n(text, "b", 1, "x", 1, -1); },
      [&] { return replace_n(text, "b", 1, "x", 1, INT_MIN); },
  };
  for (std::size_t i = 0; i < statements.size(); ++i) {
    SCOPED_TRACE(i);
    EXPECT_ASSERTION(statements[i](), "zxstrm2");
    kit::with_failures_dropped([&] { EXPECT_EQ(statements[i](), 0); });
    EXPECT_EQ(text_of(text), "abc");
  }
}

TEST(zxstrm2, null_texts_are_refused) {
  zxStr text("abc");
  const char* const none = nullptr;
  const std::vector<std::function<bool()>> statements = {
      [&] { return replace1(text, none, "x"); },
      [&] { return replace1(text, "b", none); },
      [&] { return replace_all(text, none, "x"); },
      [&] { return replace_all(text, "b", none); },
      [&] { return replace_all(text, none, 1, "x", 1); },
      [&] { return replace_all(text, "b", 1, none, 1); },
  };
  for (std::size_t i = 0; i < statements.size(); ++i) {
    SCOPED_TRACE(i);
    EXPECT_TRUE(kit::failure_of([&] {
                  statements[i]();
                }).message.starts_with("1000: bailed out: zx"));
    kit::with_failures_dropped([&] { EXPECT_FALSE(statements[i]()); });
    EXPECT_EQ(text_of(text), "abc");
  }
}

// -------------------------------------------------------------- the model

// The replacement language, read byte by byte from its description.
class SlowExpansion {
 public:
  explicit SlowExpansion(std::string_view replacement) : rest(replacement) {}

  // Expands for the match that the record holds.
  std::string text() {
    std::int32_t choice = zx_match.alternative[0];
    while (!rest.empty()) {
      const char byte = take();
      if (byte == '|' && choice > 0) {
        if (--choice == 0) break;
        out.clear();
      } else if ((byte == '`' || byte == '\\') && !rest.empty()) {
        add_escape();
      } else {
        out += byte;
      }
    }
    return out;
  }

 private:
  char take() {
    const char byte = rest.front();
    rest.remove_prefix(1);
    return byte;
  }
  bool digit_at(std::size_t i) const {
    return i < rest.size() && rest[i] >= '0' && rest[i] <= '9';
  }
  void add_escape() {
    constexpr std::string_view k_letters = "abfnrt";
    if (digit_at(0) && digit_at(1) && digit_at(2)) {
      out += static_cast<char>(std::stoi(std::string(rest, 0, 3), nullptr, 8));
      rest.remove_prefix(3);
    } else if (digit_at(0)) {
      add_group(take() - '0');
    } else if (const char byte = take();
               k_letters.find(byte) != k_letters.npos) {
      out += "\a\b\f\n\r\t"[k_letters.find(byte)];
    } else {
      out += byte;
    }
  }
  void add_group(int n) {
    if (zx_match.start[n] != nullptr)
      out.append(zx_match.start[n], zx_match.end[n]);
  }

  std::string_view rest;
  std::string out;
};

// How replacing goes on from match to match, with one search for each.
class SlowReplacing {
 public:
  SlowReplacing(const std::string& subject, const std::string& pattern)
      : text(subject),
        regex(regcomp(pattern.data(), pattern.data() + pattern.size())),
        end(text.data() + text.size()) {}
  SlowReplacing(const SlowReplacing&) = delete;
  SlowReplacing& operator=(const SlowReplacing&) = delete;
  ~SlowReplacing() { zx_realloc(regex, 0); }

  Replaced run(const std::string& replacement, std::int32_t wanted) {
    left = wanted;
    place = text.data();
    if (!regexec(regex, place, end)) return {text, 0};
    Replaced result{"", 0};
    do {
      result.text.append(place, zx_match.start[0]);
      result.text += SlowExpansion(replacement).text();
      ++result.count;
      place = zx_match.end[0];
    } while (search() && (!is_stuck() || (pass_over(result.text), search())));
    result.text.append(place, end);
    return result;
  }

 private:
  bool search() {
    --left;
    if (left == 0 || place == end) return false;
    const char before = place == text.data() ? '\0' : place[-1];
    return regexec_from(regex, place, end, before);
  }
  bool is_stuck() const {
    return zx_match.start[0] == place && zx_match.end[0] == place;
  }
  void pass_over(std::string& out) { out += *place++; }

  const std::string text;
  zxRegex* const regex;
  const char* const end;
  const char* place = nullptr;
  std::int32_t left = 0;
};

TEST(zxstrm2, the_model_knows_the_examples) {
  EXPECT_EQ(SlowReplacing("baaa", "a*").run("x", INT_MAX),
            (Replaced{"xbx", 2}));
  EXPECT_EQ(SlowReplacing("bb", "a*").run("x", INT_MAX), (Replaced{"xbxb", 2}));
  EXPECT_EQ(SlowReplacing("baaa", "a*").run("x", 2), (Replaced{"xbaaa", 1}));
  EXPECT_EQ(SlowReplacing("-a-b-", "(a)|b").run("<`1>|`102", 9),
            (Replaced{"-<a>-B-", 2}));
}

// Random texts made of the words of a list.
class Words {
 public:
  explicit Words(unsigned seed) : random(seed) {}

  int below(int n) {
    return static_cast<int>(random() % static_cast<unsigned>(n));
  }
  std::string some(const Texts& words, int most) {
    std::string text;
    for (int i = below(most + 1); i > 0; --i)
      text += words[static_cast<std::size_t>(
          below(static_cast<int>(words.size())))];
    return text;
  }

 private:
  std::mt19937 random;
};

const Texts k_pattern_words = {
    "a",  "b",   "ab",   "x",    ".",   "[ab]",  "[^a]", "(a)",      "(b)",
    "()", "a*",  "b+",   "a?",   ".*?", "a+?",   "`b",   "`B",       "^",
    "$",  "`d+", "(ab)", "(x)?", "%d",  "(a|b)", "`1",   "{{a|bx}}", "(a|b)*"};
const Texts k_subject_words = {"a", "b", "ab", "aa", "x", " ", "1", "-", "``"};
const Texts k_replacement_words = {"x",  "yz", "`0",   "`1",    "`2",   "\\1",
                                   "`3", "12", "`101", "\\012", "|",    "`|",
                                   "``", "`n", "`q",   "0",     "[",    "]",
                                   "`",  "\\", "||",   "`1`2",  "`0`0", ""};

std::string random_pattern(Words& words) {
  std::string pattern = words.some(k_pattern_words, 3);
  while (words.below(3) == 0) pattern += "|" + words.some(k_pattern_words, 2);
  return pattern;
}

TEST(zxstrm2, replacing_agrees_with_a_slow_model) {
  Words words(20);
  int replacements = 0;
  for (int i = 0; i < 8000; ++i) {
    const std::string pattern = random_pattern(words);
    const std::string subject = words.some(k_subject_words, 9);
    const std::string replacement = words.some(k_replacement_words, 4);
    const std::int32_t count =
        words.below(2) == 0 ? INT_MAX : 1 + words.below(6);
    const Replaced expected =
        SlowReplacing(subject, pattern).run(replacement, count);
    ASSERT_EQ(replaced_n(subject, pattern, replacement, count), expected)
        << "'" << pattern << "' on '" << subject << "' by '" << replacement
        << "', " << count;
    replacements += expected.count;
  }
  EXPECT_GT(replacements, 4000);
}

// ---------------------------------------------------------------- the time

using Clock = std::chrono::steady_clock;

// The time of replacing in a text of n bytes, the best of three.
Clock::duration time_of(std::string_view unit, std::size_t n,
                        std::string_view pattern, std::string_view text) {
  std::string subject;
  while (subject.size() < n) subject += unit;
  auto best = Clock::duration::max();
  for (int i = 0; i < 3; ++i) {
    zxStr copy = str(subject);
    const auto start = Clock::now();
    EXPECT_TRUE(replace_all(copy, str(pattern), str(text)));
    best = std::min(best, Clock::now() - start);
  }
  return best;
}

TEST(zxstrm2_slow, the_time_of_replacing_grows_with_the_text_alone) {
  const struct {
    std::string_view unit;
    std::string_view pattern;
    std::string_view replacement;
  } rows[] = {
      {"abcdefgh", "c", "xyz"}, {"word, ", "`w+", "<`0>"},  {"abc ", "x*", "-"},
      {"aab", "a*b", "x"},      {"abcdefgh", "a|e", "1|2"},
  };
  constexpr std::size_t k_mega = 1 << 20;
  for (const auto& row : rows) {
    const auto one = time_of(row.unit, k_mega, row.pattern, row.replacement);
    const auto four =
        time_of(row.unit, 4 * k_mega, row.pattern, row.replacement);
    // Four times the time is expected, sixteen times would be square.
    EXPECT_LT(four, 10 * one + std::chrono::milliseconds(100)) << row.pattern;
  }
}

// How often memory was taken, resized or given back.
int memory_calls = 0;
void* counting_realloc(void* block, std::size_t size) {
  ++memory_calls;
  return zx_heap_realloc(block, size);
}

TEST(zxstrm2, a_result_is_built_in_few_blocks) {
  for (const char* pattern : {"b", "x*", ".", "b|c", "ab"}) {
    zxStr text = str(std::string(200000, 'b'));
    text.append("ab");
    match(text, pattern);  // compiled, and the matcher has its stack
    memory_calls = 0;
    zx_realloc = counting_realloc;
    EXPECT_TRUE(replace_all(text, pattern, "-"));
    zx_realloc = zx_heap_realloc;
    EXPECT_LT(memory_calls, 100) << pattern;
  }
}

TEST(zxstrm2, a_long_text_is_replaced_in) {
  std::string subject;
  std::string expected;
  for (int i = 0; i < 100000; ++i) {
    subject += std::to_string(i) + "=a;";
    expected += "a:" + std::to_string(i) + ";";
  }
  EXPECT_EQ(replaced(subject, "(`d+)=(`w)", "`2:`1"), expected);
}

// ----------------------------------------------------------------- cutting

// The pieces that a cutting operation gives, up to its end.
using Cut = bool (*)(zxStr& subject, zxStr& piece, const zxStr& pattern);
Texts pieces_of(Cut cut, std::string_view subject, std::string_view pattern) {
  zxStr text = str(subject);
  zxStr piece("former");
  Texts pieces;
  while (cut(text, piece, str(pattern))) pieces.push_back(text_of(piece));
  EXPECT_EQ(text_of(text), "");
  EXPECT_EQ(text_of(piece), "");
  return pieces;
}

TEST(zxstrm2, a_text_is_cut_into_pieces) {
  const struct {
    std::string_view pattern;
    std::string_view subject;
    Texts pieces;
    Texts not_empty;
  } rows[] = {
      {",", "", {}, {}},
      {",", "a", {"a"}, {"a"}},
      {",", "a,b,c", {"a", "b", "c"}, {"a", "b", "c"}},
      {",", ",a", {"", "a"}, {"a"}},
      {",", "a,", {"a"}, {"a"}},
      {",", ",", {""}, {}},
      {",", ",,a,,b,,", {"", "", "a", "", "b", ""}, {"a", "b"}},
      {",+", ",,a,,b,,", {"", "a", "b"}, {"a", "b"}},
      {"`s*,`s*", "a , b,c ", {"a", "b", "c "}, {"a", "b", "c "}},
      {"a", "aa", {"", ""}, {}},
      {".*", "abc", {""}, {}},
      {"`n", "a\nb", {"a", "b"}, {"a", "b"}},
      {"`0", "a\0b"sv, {"a", "b"}, {"a", "b"}},
      {",|;", "a;b,c", {"a", "b", "c"}, {"a", "b", "c"}},
      // An empty match at the start does not count, others do.
      {"x*", "abc", {"a", "b", "c"}, {"a", "b", "c"}},
      {"x*", "axxb", {"a", "b"}, {"a", "b"}},
      {"x*", "xxb", {"", "b"}, {"b"}},
      {"", "ab", {"a", "b"}, {"a", "b"}},
      {"", "a", {"a"}, {"a"}},
      // The start is not met again.
      {"^", "abc", {"abc"}, {"abc"}},
      {"^a", "aab", {"", "", "b"}, {"b"}},
      {"^|b", "abc", {"a", "c"}, {"a", "c"}},
      {"$", "abc", {"abc"}, {"abc"}},
      // The byte ahead of the second place counts for boundaries.
      {"`b", "aab", {"aab"}, {"aab"}},
      {"`b", "ab cd", {"ab", " ", "cd"}, {"ab", " ", "cd"}},
      {"`B", " ab", {" a", "b"}, {" a", "b"}},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(pieces_of(cut_first, row.subject, row.pattern), row.pieces)
        << row.pattern << " on " << row.subject;
    EXPECT_EQ(pieces_of(cut_next, row.subject, row.pattern), row.not_empty)
        << row.pattern << " on " << row.subject;
  }
}

TEST(zxstrm2, a_cut_leaves_what_is_behind_the_match) {
  zxStr text("a1b2c");
  zxStr piece;
  EXPECT_TRUE(cut_first(text, piece, "(`d)"));
  EXPECT_EQ(text_of(piece), "a");
  EXPECT_EQ(text_of(text), "b2c");
  EXPECT_EQ(group(1), "1");
  EXPECT_TRUE(cut_next(text, piece, "(`d)"));
  EXPECT_EQ(text_of(piece), "b");
  EXPECT_EQ(text_of(text), "c");
  EXPECT_EQ(group(1), "2");
  EXPECT_TRUE(cut_first(text, piece, "(`d)"));
  EXPECT_EQ(text_of(piece), "c");
  EXPECT_EQ(text_of(text), "");
  EXPECT_FALSE(cut_first(text, piece, "(`d)"));
  EXPECT_EQ(text_of(piece), "");
}

TEST(zxstrm2, separators_come_in_three_forms) {
  static const char k_pattern[] = ";,";
  zxStr text("a,b;,c;d,e");
  zxStr piece;
  forget(k_pattern);
  EXPECT_TRUE(cut_first(text, piece, k_pattern));
  EXPECT_EQ(text_of(piece), "a,b");
  forget(k_pattern);
  EXPECT_TRUE(cut_first(text, piece, k_pattern, 1));
  EXPECT_EQ(text_of(piece), "c");
  EXPECT_TRUE(cut_first(text, piece, zxStr(",")));
  EXPECT_EQ(text_of(piece), "d");
  EXPECT_EQ(text_of(text), "e");

  text = ";,;,a,b;;c,,d";
  forget(k_pattern);
  EXPECT_TRUE(cut_next(text, piece, k_pattern));
  EXPECT_EQ(text_of(piece), "a,b;;c,,d");
  text = ";;a;b,,c";
  forget(k_pattern);
  EXPECT_TRUE(cut_next(text, piece, k_pattern, 1));
  EXPECT_EQ(text_of(piece), "a");
  EXPECT_TRUE(cut_next(text, piece, zxStr(",")));
  EXPECT_EQ(text_of(piece), "b");
  EXPECT_EQ(text_of(text), ",c");
  forget(k_pattern);
}

TEST(zxstrm2, separators_in_strings_may_change_in_place) {
  zxStr separator(",");
  const char* const address = separator.c_str();
  zxStr text("a,b;c");
  zxStr piece;
  EXPECT_TRUE(cut_first(text, piece, separator));
  EXPECT_EQ(text_of(text), "b;c");
  separator.at(0) = ';';
  ASSERT_EQ(separator.c_str(), address);
  EXPECT_TRUE(cut_first(text, piece, separator));
  EXPECT_EQ(text_of(text), "c");
}

TEST(zxstrm2, others_who_hold_the_text_keep_it) {
  const zxStr original("a,b");
  zxStr text = original;
  zxStr piece;
  EXPECT_TRUE(cut_first(text, piece, ","));
  EXPECT_EQ(text_of(original), "a,b");
  text = original;
  EXPECT_TRUE(cut_first(text, piece, ";"));
  EXPECT_EQ(text_of(piece), "a,b");
  EXPECT_EQ(text_of(text), "");
  EXPECT_EQ(text_of(original), "a,b");
}

TEST(zxstrm2, texts_with_room_inside_are_cut) {
  zxIStr text("a,b,c");
  zxIStr piece;
  EXPECT_TRUE(cut_first(text, piece, ","));
  EXPECT_EQ(text_of(piece), "a");
  EXPECT_TRUE(cut_next(text, piece, ","));
  EXPECT_EQ(text_of(piece), "b");
  EXPECT_TRUE(cut_next(text, piece, ","));
  EXPECT_EQ(text_of(piece), "c");
  EXPECT_FALSE(cut_next(text, piece, ","));
}

TEST(zxstrm2, the_separator_can_be_one_of_the_strings) {
  zxStr text("a");
  zxStr piece(",");
  EXPECT_TRUE(cut_first(text, piece, text));
  EXPECT_EQ(text_of(piece), "");
  EXPECT_EQ(text_of(text), "");
  text = "a,b";
  piece = ",";
  EXPECT_TRUE(cut_first(text, piece, piece));
  EXPECT_EQ(text_of(piece), "a");
  EXPECT_EQ(text_of(text), "b");
  text = ",a,b";
  piece = ",";
  EXPECT_TRUE(cut_next(text, piece, piece));
  EXPECT_EQ(text_of(piece), "a");
  EXPECT_EQ(text_of(text), "b");
}

}  // namespace
