// zxstrm_test.cpp - patterns over strings: the three forms of each operation,
// what the last match left and how long it stays, matching without case, the
// cache of compiled patterns.
// Tests zxlib/zxstrm.h and zxstrm.cpp.
#include "zxstrm.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "kit/tempdir.h"
#include "kit/text.h"

namespace {

using namespace std::string_literals;
using namespace std::string_view_literals;
using Texts = std::vector<std::string>;

using kit::text_of;

std::string group(std::int32_t n) { return text_of(group_text(n)); }

std::string field(std::int32_t n) { return text_of(field_text(n)); }

using kit::str;

// The text of the whole match, or "none"; the pattern is taken by contents.
std::string found(std::string_view subject, std::string_view pattern) {
  return match(str(subject), str(pattern)) ? group(0) : "none";
}

std::string found_without_case(std::string_view subject,
                               std::string_view pattern) {
  return imatch(str(subject), str(pattern)) ? group(0) : "none";
}

// Slots 0, 10 and 11: the match, what is before it and what is behind it.
Texts around() { return {group(0), group(10), group(11)}; }

// ---------------------------------------------------------------- searching

TEST(zxstrm, a_match_is_the_first_place_and_the_preferred_way) {
  const struct {
    std::string_view pattern;
    std::string_view subject;
    std::string_view text;
  } rows[] = {
      {"b", "abab", "b"},
      {"a+", "baaab", "aaa"},
      {"a+?", "baaab", "a"},
      {"ab|abc", "xabc", "ab"},
      {"abc|ab", "xabc", "abc"},
      {"", "abc", ""},
      {"", "", ""},
      {"a", "", "none"},
      {"^b", "ab", "none"},
      {"b$", "ba", "none"},
      {"`d+", "page 17 of 20", "17"},
      {"a.b", "a\nb", "a\nb"},
      {"^$", "\n", "none"},
      {"%d", "of   -7", "   -7"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(found(row.subject, row.pattern), row.text)
        << row.pattern << " on " << row.subject;
}

TEST(zxstrm, patterns_come_as_text_as_bytes_and_as_strings) {
  const zxStr subject("xabcx");
  static const char k_pattern[] = "abc";
  EXPECT_TRUE(match(subject, k_pattern));
  EXPECT_EQ(around(), (Texts{"abc", "x", "x"}));

  forget(k_pattern);
  EXPECT_TRUE(match(subject, k_pattern, 2));
  EXPECT_EQ(around(), (Texts{"ab", "x", "cx"}));

  forget(k_pattern);
  EXPECT_TRUE(match(subject, k_pattern, -1));
  EXPECT_EQ(group(0), "abc");

  EXPECT_TRUE(match(subject, zxStr("bc")));
  EXPECT_EQ(around(), (Texts{"bc", "xa", "x"}));
  EXPECT_FALSE(match(subject, zxStr("abd")));
}

TEST(zxstrm, patterns_without_case_come_in_the_same_forms) {
  const zxStr subject("xABCx");
  static const char k_pattern[] = "abc";
  EXPECT_TRUE(imatch(subject, k_pattern));
  EXPECT_EQ(around(), (Texts{"ABC", "x", "x"}));

  forget(k_pattern);
  EXPECT_TRUE(imatch(subject, k_pattern, 2));
  EXPECT_EQ(around(), (Texts{"AB", "x", "Cx"}));

  forget(k_pattern);
  EXPECT_TRUE(imatch(subject, k_pattern, -1));
  EXPECT_EQ(group(0), "ABC");

  EXPECT_TRUE(imatch(subject, zxStr("bc")));
  EXPECT_EQ(around(), (Texts{"BC", "xA", "x"}));
  EXPECT_FALSE(imatch(subject, zxStr("abd")));
}

TEST(zxstrm, bytes_are_searched_in_the_same_forms) {
  static const char k_bytes[] = "xabcx";
  const char* const end = k_bytes + 5;
  static const char k_pattern[] = "abc";
  EXPECT_TRUE(match_buf(k_pattern, k_bytes, end));
  EXPECT_EQ(around(), (Texts{"abc", "x", "x"}));
  EXPECT_FALSE(match_buf(k_pattern, k_bytes, k_bytes + 3));

  forget(k_pattern);
  EXPECT_TRUE(match_buf(k_pattern, 2, k_bytes, k_bytes + 3));
  EXPECT_EQ(around(), (Texts{"ab", "x", ""}));

  forget(k_pattern);
  EXPECT_TRUE(match_buf(k_pattern, -1, k_bytes, end));
  EXPECT_EQ(group(0), "abc");

  EXPECT_TRUE(match_buf(zxStr("b"), k_bytes, end));
  EXPECT_EQ(around(), (Texts{"b", "xa", "cx"}));
  EXPECT_FALSE(match_buf(zxStr("y"), k_bytes, end));
}

TEST(zxstrm, groups_of_bytes_are_places_in_the_callers_buffer) {
  char bytes[] = "key=value";
  ASSERT_TRUE(match_buf("(`w+)=", bytes, bytes + 9));
  EXPECT_EQ(zx_match.start[1], bytes);
  EXPECT_EQ(zx_match.end[1], bytes + 3);
  bytes[0] = 'K';
  EXPECT_EQ(group(1), "Key");
}

TEST(zxstrm, a_buffer_is_read_up_to_its_end_only) {
  for (const char* pattern :
       {"a$", "a`b", "a*$", "%d$|a$", "^a", "(a)`1|a$", "[a-c]+$", "a*?$"}) {
    const auto byte = std::make_unique<char>('a');  // none behind it is ours
    EXPECT_TRUE(match_buf(pattern, byte.get(), byte.get() + 1)) << pattern;
    EXPECT_EQ(group_length(0), 1) << pattern;
    EXPECT_FALSE(match_buf("^a", byte.get(), byte.get()));
  }
}

TEST(zxstrm, nul_is_a_byte_of_subjects_and_patterns) {
  const std::string subject = "xa\0by"s;
  EXPECT_EQ(found(subject, "a\0b"sv), "a\0b"s);
  EXPECT_EQ(found(subject, "a`0b"), "a\0b"s);
  EXPECT_EQ(found(subject, "a`000b"), "a\0b"s);
  EXPECT_EQ(found(subject, "a.b"), "a\0b"s);
  EXPECT_EQ(found(subject, "[^`0-z]"), "none");
  EXPECT_EQ(found("ab", "a\0b"sv), "none");

  static const char k_pattern[] = "a\0b";
  const zxStr held = str(subject);
  EXPECT_TRUE(match(held, k_pattern, 3));
  EXPECT_EQ(group(0), "a\0b"s);
  forget(k_pattern);
  EXPECT_TRUE(match(held, k_pattern));
  EXPECT_EQ(group(0), "a");
  forget(k_pattern);
  EXPECT_TRUE(match_buf(k_pattern, 3, subject.data(), subject.data() + 5));
  EXPECT_EQ(around(), (Texts{"a\0b"s, "x", "y"}));
}

TEST(zxstrm, a_pattern_of_length_0_is_the_empty_one) {
  static const char k_pattern[] = "abc";
  EXPECT_TRUE(match(zxStr("xyz"), k_pattern, 0));
  EXPECT_EQ(around(), (Texts{"", "", "xyz"}));
}

TEST(zxstrm, patterns_can_be_checked_without_a_failure) {
  for (const char* valid :
       {"", "a", "a`.b", "^`d*$", "(a*)?", "a*?", "a{2,3}", "a{2,3", "a{x}",
        "[]a]", "[-a]", "[a-]", "[`d`s]", "{{a|b}}c", "()", "^%0C$"})
    EXPECT_TRUE(check_pattern(zxStr(valid))) << valid;
  for (const char* invalid :
       {"x**", "x+?*", "(a*)*", "(^)+", "(ab)*?", "(ab){2}", "[z-a]", "%+s",
        "(a", "a)", "a`", "[a", "*", "{{a", "`400", "%_5d", "%"})
    EXPECT_FALSE(check_pattern(zxStr(invalid))) << invalid;
  EXPECT_TRUE(check_pattern(str("a\0b"sv)));
  EXPECT_FALSE(check_pattern(str("a\0("sv)));
}

// ----------------------------------------------------------- bad patterns

TEST(zxstrm, a_bad_pattern_is_message_1752_in_every_form) {
  const zxStr subject("abc");
  const zxStr bad("(ab");
  const std::string message = "1752: regcomp: bad reg '(ab'";
  const std::string line = kit::line_of(1752, "(ab");
  static const char k_bytes[] = "abc";
  EXPECT_FAILURE(match(subject, "(ab"), message, line);
  EXPECT_FAILURE(match(subject, "(abc)", 3), message, line);
  EXPECT_FAILURE(match(subject, bad), message, line);
  EXPECT_FAILURE(imatch(subject, "(ab"), message, line);
  EXPECT_FAILURE(imatch(subject, "(abc)", 3), message, line);
  EXPECT_FAILURE(imatch(subject, bad), message, line);
  EXPECT_FAILURE(match_buf("(ab", k_bytes, k_bytes + 3), message, line);
  EXPECT_FAILURE(match_buf("(abc)", 3, k_bytes, k_bytes + 3), message, line);
  EXPECT_FAILURE(match_buf(bad, k_bytes, k_bytes + 3), message, line);
  EXPECT_FAILURE(get_regex("(ab"), message, line);
  EXPECT_FAILURE(get_regex("(abc)", 3), message, line);
}

TEST(zxstrm, a_bad_pattern_fails_each_time) {
  const zxStr subject("abc");
  static const char k_pattern[] = "x(";
  for (int i = 0; i < 3; ++i)
    EXPECT_FAILURE(match(subject, k_pattern), "1752: regcomp: bad reg 'x('",
                   kit::line_of(1752, "x("));
}

TEST(zxstrm, the_message_shows_140_bytes_of_the_pattern) {
  const zxStr subject("abc");
  const std::string pattern = "(" + std::string(139, 'a');
  const std::string longer = pattern + "b";
  const std::string message = "1752: regcomp: bad reg '" + pattern + "'";
  forget(pattern.c_str());
  forget(longer.c_str());
  EXPECT_EQ(kit::failure_of([&] { match(subject, pattern.c_str()); }).message,
            message);
  EXPECT_EQ(kit::failure_of([&] { match(subject, longer.c_str()); }).message,
            message);
}

TEST(zxstrm, a_program_beyond_its_limit_is_message_1751) {
  const zxStr subject("abc");
  const std::string pattern(11000, '.');  // nodes of three bytes
  forget(pattern.c_str());
  EXPECT_EQ(kit::failure_of([&] { match(subject, pattern.c_str()); }).message,
            "1751: regcomp: too big");
  EXPECT_TRUE(check_pattern(zxStr(pattern.c_str())));
}

TEST(zxstrm, a_failed_pattern_leaves_the_former_match) {
  const zxStr subject("abc");
  ASSERT_TRUE(match(subject, "b"));
  EXPECT_TRUE(kit::failure_of([&] { match(subject, "[a"); }).failed);
  EXPECT_EQ(around(), (Texts{"b", "a", "c"}));
}

TEST(zxstrm, with_failures_dropped_a_bad_pattern_never_matches) {
  const zxStr subject("abc");
  static const char k_pattern[] = "a)";
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(match(subject, k_pattern));
    EXPECT_FALSE(match(subject, zxStr("a)")));
    EXPECT_FALSE(imatch(subject, k_pattern));
    EXPECT_FALSE(imatch(subject, zxStr("a)")));
    EXPECT_FALSE(match_buf(k_pattern, subject.begin(), subject.end()));
    EXPECT_FALSE(match_buf(zxStr("a)"), subject.begin(), subject.end()));
    EXPECT_EQ(get_regex(k_pattern), nullptr);
    EXPECT_FALSE(match(subject, static_cast<const char*>(nullptr)));
    EXPECT_EQ(get_regex(nullptr), nullptr);
    EXPECT_FALSE(match_buf("a", nullptr, nullptr));
  });
  EXPECT_TRUE(match(subject, "a"));
}

TEST(zxstrm, null_pointers_are_refused) {
  const zxStr subject("abc");
  const char* const none = nullptr;
  for (const auto& statement : std::vector<std::function<void()>>{
           [&] { match(subject, none); }, [&] { match(subject, none, 0); },
           [&] { imatch(subject, none); }, [&] { imatch(subject, none, 2); },
           [&] { match_buf(none, subject.begin(), subject.end()); },
           [&] { get_regex(none); }}) {
    const kit::Failure failure = kit::failure_of(statement);
    EXPECT_TRUE(failure.failed);
    EXPECT_TRUE(failure.message.starts_with("1000: bailed out: zx"))
        << failure.message;
  }
  EXPECT_EQ(kit::failure_of([] { match_buf("a", nullptr, nullptr); }).message,
            "1753: regexec: bad args");
}

// --------------------------------------------------------- reading a match

TEST(zxstrm, groups_are_read_by_number) {
  ASSERT_TRUE(match(zxStr("set color=red;"), "(`w+)=((r)(e)(d))"));
  const Texts expected = {"color=red", "color", "red", "r", "e",    "d",
                          "",          "",      "",    "",  "set ", ";"};
  for (std::int32_t n = 0; n < 12; ++n) {
    SCOPED_TRACE(n);
    const std::string& text = expected[zx_size(n)];
    EXPECT_EQ(group(n), text);
    EXPECT_EQ(group_length(n), zx_count(text.size()));
    zxStr out("former");
    group_assign(n, out);
    EXPECT_EQ(text_of(out), text);
  }
}

TEST(zxstrm, a_group_that_took_no_part_is_empty) {
  ASSERT_TRUE(match(zxStr("b"), "(a)|(b)"));
  EXPECT_EQ(group(1), "");
  EXPECT_EQ(group_length(1), 0);
  EXPECT_EQ(group(2), "b");
  zxStr out("former");
  group_assign(1, out);
  EXPECT_TRUE(out.is_empty());
}

TEST(zxstrm, nine_groups_are_captured) {
  ASSERT_TRUE(match(zxStr("123456789"), "(1)(2)(3)(4)(5)(6)(7)(8)(9)"));
  for (std::int32_t n = 1; n <= 9; ++n) EXPECT_EQ(group(n), std::to_string(n));
}

TEST(zxstrm, a_match_that_fails_leaves_all_unset) {
  ASSERT_TRUE(match(zxStr("a1"), "(a)%d"));
  ASSERT_FALSE(match(zxStr("xyz"), "[a-c]"));
  for (std::int32_t n = 0; n < 12; ++n) EXPECT_EQ(group(n), "") << n;
  for (std::int32_t n = 1; n <= 20; ++n) {
    EXPECT_EQ(field(n), "") << n;
    EXPECT_EQ(field_type(n), '\0') << n;
  }
}

TEST(zxstrm, a_group_can_be_assigned_to_its_own_subject) {
  zxStr subject("one two");
  ASSERT_TRUE(match(subject, "(`w+) (`w+)"));
  group_assign(2, subject);
  EXPECT_EQ(text_of(subject), "two");
  group_assign(1, subject);
  EXPECT_EQ(text_of(subject), "one");
  EXPECT_EQ(group(0), "one two");
}

TEST(zxstrm, a_group_is_a_subject_in_its_turn) {
  ASSERT_TRUE(match(zxStr("<a=1>"), "<(.*)>"));
  ASSERT_TRUE(match(group_text(1), "(.)=(.)"));
  EXPECT_EQ(group(1), "a");
  EXPECT_EQ(group(2), "1");
  ASSERT_TRUE(match(group_text(2), "`d"));
  EXPECT_EQ(around(), (Texts{"1", "", ""}));
}

TEST(zxstrm, another_group_number_fails_an_assertion) {
  zxStr out("former");
  for (const std::int32_t n : {-1, 12, 20, INT32_MIN, INT32_MAX}) {
    SCOPED_TRACE(n);
    EXPECT_ASSERTION(group_text(n), "zxstrm");
    EXPECT_ASSERTION(group_length(n), "zxstrm");
    EXPECT_ASSERTION(group_assign(n, out), "zxstrm");
    EXPECT_ASSERTION(alternative(n), "zxstrm");
  }
}

TEST(zxstrm, another_field_number_fails_an_assertion) {
  for (const std::int32_t n : {-1, 0, 21, INT32_MIN, INT32_MAX}) {
    SCOPED_TRACE(n);
    EXPECT_ASSERTION(field_text(n), "zxstrm");
    EXPECT_ASSERTION(field_type(n), "zxstrm");
  }
}

TEST(zxstrm, with_failures_dropped_other_numbers_count_as_unset) {
  ASSERT_TRUE(match(zxStr("b7"), "(a|b)%d"));
  kit::with_failures_dropped([] {
    for (const std::int32_t n : {-1, 12, INT32_MIN, INT32_MAX}) {
      EXPECT_EQ(group(n), "");
      EXPECT_EQ(group_length(n), 0);
      zxStr out("former");
      group_assign(n, out);
      EXPECT_EQ(text_of(out), "");
      EXPECT_EQ(alternative(n), -1);
    }
    for (const std::int32_t n : {-1, 0, 21, INT32_MIN, INT32_MAX}) {
      EXPECT_EQ(field(n), "");
      EXPECT_EQ(field_type(n), '\0');
    }
  });
  EXPECT_EQ(group(1), "b");
}

// ----------------------------------------------------------------- fields

TEST(zxstrm, fields_are_read_by_their_order_in_the_pattern) {
  ASSERT_TRUE(match(zxStr("a -17,0x1F,3.25k,31/12/99,\"q\\\"\",word"),
                    "%d,%x,%v,%t,%C,%s"));
  const Texts expected = {" -17",     "0x1F",      "3.25k",
                          "31/12/99", "\"q\\\"\"", "word"};
  const std::string types = "dxvtCs";
  for (std::int32_t n = 1; n <= 6; ++n) {
    EXPECT_EQ(field(n), expected[zx_size(n - 1)]) << n;
    EXPECT_EQ(field_type(n), types[zx_size(n - 1)]) << n;
  }
  for (std::int32_t n = 7; n <= 20; ++n) {
    EXPECT_EQ(field(n), "") << n;
    EXPECT_EQ(field_type(n), '\0') << n;
  }
}

TEST(zxstrm, a_field_that_took_no_part_is_unset) {
  ASSERT_TRUE(match(zxStr("b2.5"), "a%d|b%f"));
  EXPECT_EQ(field_type(1), '\0');
  EXPECT_EQ(field(1), "");
  EXPECT_EQ(field_type(2), 'f');
  EXPECT_EQ(field(2), "2.5");
}

TEST(zxstrm, nineteen_fields_are_read) {
  std::string pattern;
  std::string subject;
  for (int i = 1; i <= 19; ++i) {
    pattern += "%d,";
    subject += std::to_string(i * i) + ",";
  }
  ASSERT_EQ(found(subject, pattern), subject);
  for (std::int32_t n = 1; n <= 19; ++n)
    EXPECT_EQ(field(n), std::to_string(n * n));
  EXPECT_EQ(field_type(20), '\0');
  EXPECT_FALSE(check_pattern(str(pattern + "%d")));
}

TEST(zxstrm, fields_stay_when_the_subject_is_gone) {
  {
    zxStr subject("width 640 height 480");
    ASSERT_TRUE(match(subject, "width%d height%d"));
    subject = "something else";
  }
  EXPECT_EQ(field(1), " 640");
  EXPECT_EQ(field(2), " 480");
}

// ------------------------------------------------------------ alternatives

TEST(zxstrm, the_alternative_taken_counts_from_0) {
  const struct {
    const char* pattern;
    const char* subject;
    std::int32_t slot;
    std::int32_t alternative;
  } rows[] = {
      {"a", "a", 0, -1},
      {"a|b", "a", 0, 0},
      {"a|b", "b", 0, 1},
      {"a|b|", "x", 0, 2},
      {"(x|y|z)", "z", 1, 2},
      {"(x|y|z)", "z", 0, -1},
      {"(x|y)(p|q|r)", "yr", 1, 1},
      {"(x|y)(p|q|r)", "yr", 2, 2},
      {"(x)", "x", 1, -1},
      {"{{p|q}}r", "qr", 0, 1},
      {"{{p|q}}r", "pr", 0, 0},
      // Optional parts are choices of the group in which they stand.
      {"colou?r", "colour", 0, 0},
      {"colou?r", "color", 0, 1},
      {"(colou?r)", "color", 1, 1},
      {"(colou?r)", "color", 0, -1},
      // Behind its end a group goes on counting.
      {"(a|b)c?", "bc", 1, 0},
      {"(a|b)c?", "b", 1, 1},
      // What failed tries have counted is not put back.
      {"ab?c|ad", "ad", 0, 2},
      // Counted and starred bytes are no choices.
      {"a*b{2,3}c+", "abbc", 0, -1},
  };
  for (const auto& row : rows) {
    ASSERT_TRUE(match(zxStr(row.subject), row.pattern)) << row.pattern;
    EXPECT_EQ(alternative(row.slot), row.alternative)
        << row.pattern << " on " << row.subject << ", slot " << row.slot;
  }
}

TEST(zxstrm, the_text_around_a_match_has_no_alternatives) {
  ASSERT_TRUE(match(zxStr("xby"), "a|b"));
  EXPECT_EQ(alternative(10), -1);
  EXPECT_EQ(alternative(11), -1);
}

// ------------------------------------------------------- the subject holder

TEST(zxstrm, groups_outlive_changes_of_the_subject) {
  const std::vector<std::function<void(zxStr&)>> changes = {
      [](zxStr& s) { s.at(1) = 'X'; },
      [](zxStr& s) { s.append("more"); },
      [](zxStr& s) { s.append('m'); },
      [](zxStr& s) { s = "other"; },
      [](zxStr& s) { s.clear(); },
      [](zxStr& s) { s.set_length(1); },
      [](zxStr& s) { s.to_upper(); },
      [](zxStr& s) { s.reserve(100000); },
      [](zxStr& s) { std::memset(s.buffer(6), 'z', 6); },
  };
  for (std::size_t i = 0; i < changes.size(); ++i) {
    SCOPED_TRACE(i);
    zxStr subject("abcdef");
    subject.reserve(100);
    ASSERT_TRUE(match(subject, "b(cd)"));
    changes[i](subject);
    EXPECT_EQ(around(), (Texts{"bcd", "a", "ef"}));
    EXPECT_EQ(group(1), "cd");
  }
}

TEST(zxstrm, groups_outlive_the_subject) {
  {
    const zxStr subject("abcdef");
    ASSERT_TRUE(match(subject, "b(cd)"));
  }
  const zxStr other("zzzzzz");  // in the place of the old one
  EXPECT_EQ(around(), (Texts{"bcd", "a", "ef"}));
  EXPECT_EQ(group(1), "cd");

  EXPECT_TRUE(match(zxStr("uvw"), "v"));
  EXPECT_EQ(around(), (Texts{"v", "u", "w"}));
}

TEST(zxstrm, groups_outlive_a_subject_with_room_inside) {
  {
    zxIStr subject("abcdef");
    ASSERT_TRUE(match(subject, "b(cd)"));
    subject.at(2) = 'X';
    EXPECT_EQ(group(1), "cd");
    ASSERT_TRUE(imatch(subject, "b(xd)"));
    subject.at(3) = 'Y';
    EXPECT_EQ(group(1), "Xd");
  }
  EXPECT_EQ(around(), (Texts{"bXd", "a", "ef"}));
}

TEST(zxstrm, the_subject_is_shared_and_not_copied) {
  const zxStr subject("abcdef");
  ASSERT_TRUE(match(subject, "cd"));
  EXPECT_EQ(zx_match.start[0], subject.c_str() + 2);
  EXPECT_EQ(zx_match.end[0], subject.c_str() + 4);
  EXPECT_EQ(subject.representation()->refs, 2);
  ASSERT_TRUE(imatch(subject, "ef"));
  EXPECT_EQ(zx_match.start[0], subject.c_str() + 4);
  EXPECT_EQ(subject.representation()->refs, 2);

  ASSERT_TRUE(match(zxStr("other"), "t"));
  EXPECT_EQ(subject.representation()->refs, 1);
}

TEST(zxstrm, searching_bytes_leaves_the_held_subject) {
  const zxStr subject("abcdef");
  ASSERT_TRUE(match(subject, "cd"));
  static const char k_bytes[] = "xyz";
  ASSERT_TRUE(match_buf("y", k_bytes, k_bytes + 3));
  EXPECT_EQ(around(), (Texts{"y", "x", "z"}));
  EXPECT_EQ(subject.representation()->refs, 2);
}

// A search that ends by the first byte behind "^", or because a literal is
// missing, leaves the former results, and the text that they lead into.
TEST(zxstrm, groups_left_by_a_search_cut_short_still_have_their_text) {
  const struct {
    const char* pattern;
    const char* subject;
  } rows[] = {{"^q", "bbb"}, {"^q", ""}, {"z*foo", "bar"}, {"z*foo", "fo"}};
  using Search = bool (*)(const zxStr& subject, const char* pattern);
  const Search searches[] = {
      [](const zxStr& s, const char* p) { return match(s, p); },
      [](const zxStr& s, const char* p) { return match(s, zxStr(p)); },
      [](const zxStr& s, const char* p) { return imatch(s, p); },
      [](const zxStr& s, const char* p) {
        return match_buf(p, s.begin(), s.end());
      },
  };
  for (const auto& row : rows) {
    for (const Search search : searches) {
      ASSERT_TRUE(match(zxStr("xa7y"), "(a)%d"));
      for (int i = 0; i < 2; ++i) {
        zxStr subject(row.subject);
        EXPECT_FALSE(search(subject, row.pattern)) << row.pattern;
        subject = "written over";
      }
      EXPECT_EQ(around(), (Texts{"a7", "x", "y"})) << row.pattern;
      EXPECT_EQ(group(1), "a");
      EXPECT_EQ(field(1), "7");
    }
  }
}

TEST(zxstrm, bytes_of_a_buffer_can_be_left_as_well) {
  static const char k_bytes[] = "xay";
  ASSERT_TRUE(match_buf("a", k_bytes, k_bytes + 3));
  EXPECT_FALSE(imatch(zxStr("bbb"), "^q"));
  EXPECT_EQ(zx_match.start[0], k_bytes + 1);
  EXPECT_EQ(around(), (Texts{"a", "x", "y"}));
}

TEST(zxstrm, a_subject_can_be_searched_again_and_again) {
  zxStr subject("aaa");
  for (int i = 0; i < 3; ++i) {
    ASSERT_TRUE(match(subject, "a"));
    subject.at(i) = 'b';
    EXPECT_EQ(group(10), std::string(zx_size(i), 'b'));
  }
  EXPECT_EQ(text_of(subject), "bbb");
  EXPECT_FALSE(match(subject, "a"));
}

// -------------------------------------------------------- without the case

TEST(zxstrm, without_case_the_subject_is_folded_and_the_pattern_is_not) {
  const struct {
    std::string_view pattern;
    std::string_view subject;
    std::string_view text;
  } rows[] = {
      {"abc", "xAbCx", "AbC"},
      {"abc", "ABC", "ABC"},
      {"abc", "abc", "abc"},
      {"Abc", "Abc", "none"},
      {"Abc", "abc", "none"},
      {"Abc", "ABC", "none"},
      {"[A-Z]", "aAzZ", "none"},
      {"[a-z]+", "1aBzZ1", "aBzZ"},
      {"[^a-z]+", "AB12CD", "12"},
      {"(a)`1", "xaA", "aA"},
      {"`w+", "-aB1-", "aB1"},
      {"`101", "A", "none"},
      {"`141", "A", "A"},
      // No other byte has a case.
      {"\xC0", "\xE0", "none"},
      {"\xE0", "\xC0", "none"},
      {"\xC0", "\xC0", "\xC0"},
      {"[@`[{`{]+", "@[`{", "@["},
      {"", "A", ""},
  };
  for (const auto& row : rows)
    EXPECT_EQ(found_without_case(row.subject, row.pattern), row.text)
        << row.pattern << " on " << row.subject;
}

TEST(zxstrm, without_case_groups_and_fields_are_of_the_subject_itself) {
  const zxStr subject("Key=0X1F; WORD END");
  ASSERT_TRUE(imatch(subject, "(key)=%x; %s (e)(x)?"));
  EXPECT_EQ(around(), (Texts{"Key=0X1F; WORD E", "", "ND"}));
  EXPECT_EQ(group(1), "Key");
  EXPECT_EQ(group(2), "E");
  EXPECT_EQ(group(3), "");
  EXPECT_EQ(zx_match.start[3], nullptr);
  EXPECT_EQ(field(1), "0X1F");
  EXPECT_EQ(field(2), "WORD");
  EXPECT_EQ(field_type(2), 's');
  EXPECT_EQ(zx_match.start[0], subject.c_str());
  EXPECT_EQ(zx_match.field[0].start, subject.c_str() + 4);
  EXPECT_EQ(zx_match.field[2].start, nullptr);
}

TEST(zxstrm, without_case_the_subject_stays_as_it_is) {
  const zxStr subject("AbC");
  const zxStrRep* const before = subject.representation();
  ASSERT_TRUE(imatch(subject, "abc"));
  EXPECT_EQ(text_of(subject), "AbC");
  EXPECT_EQ(subject.representation(), before);
}

TEST(zxstrm, without_case_groups_outlive_the_subject) {
  {
    zxStr subject("xABCy");
    ASSERT_TRUE(imatch(subject, "a(b)c"));
    subject.append("more");
  }
  EXPECT_EQ(around(), (Texts{"ABC", "x", "y"}));
  EXPECT_EQ(group(1), "B");
}

TEST(zxstrm, without_case_a_search_that_fails_leaves_all_unset) {
  ASSERT_TRUE(match(zxStr("a1"), "(a)%d"));
  ASSERT_FALSE(imatch(zxStr("XYZ"), "[a-c]"));
  for (std::int32_t n = 0; n < 12; ++n) EXPECT_EQ(group(n), "") << n;
  EXPECT_EQ(field_type(1), '\0');
}

TEST(zxstrm, without_case_an_empty_subject_is_one) {
  ASSERT_TRUE(imatch(zxStr(), "^$"));
  EXPECT_EQ(around(), (Texts{"", "", ""}));
  EXPECT_FALSE(imatch(zxStr(), "a"));
}

// ---------------------------------------------------------------- the cache

// Hits, misses and flushes during the statement.
using Counts = std::vector<std::int32_t>;
Counts counts_of(const std::function<void()>& statement) {
  const zxRegexCounts before = regex_counts();
  statement();
  const zxRegexCounts& now = regex_counts();
  return {now.hits - before.hits, now.misses - before.misses,
          now.flushes - before.flushes};
}

// A slot of the cache, by the address.
std::uint32_t slot_of(const char* place) {
  const auto address =
      static_cast<std::uint32_t>(reinterpret_cast<std::uintptr_t>(place));
  return (137 * address + 97 * (address >> 16)) % 1024;
}

// Room in which patterns with chosen addresses are written.
constexpr std::size_t k_half = 65536;
char room[3 * k_half];

// The first place in the room for which the condition holds.
char* place_where(const std::function<bool(const char*)>& condition) {
  for (char& place : room)
    if (condition(&place)) return &place;
  return nullptr;
}

void write(char* place, const char* pattern) {
  std::strcpy(place, pattern);
  forget(place);
}

TEST(zxstrm, a_pattern_is_compiled_at_its_first_use_alone) {
  static const char k_pattern[] = "cache(d)";
  const zxStr subject("cached");
  forget(k_pattern);
  EXPECT_EQ(counts_of([&] { match(subject, k_pattern); }), (Counts{0, 1, 0}));
  EXPECT_EQ(counts_of([&] { match(subject, k_pattern); }), (Counts{1, 0, 0}));
  EXPECT_EQ(counts_of([&] { imatch(subject, k_pattern); }), (Counts{1, 0, 0}));
  EXPECT_EQ(
      counts_of([&] { match_buf(k_pattern, subject.begin(), subject.end()); }),
      (Counts{1, 0, 0}));
  EXPECT_EQ(counts_of([&] { get_regex(k_pattern); }), (Counts{1, 0, 0}));
  EXPECT_EQ(get_regex(k_pattern), get_regex(k_pattern, 8));
}

TEST(zxstrm, forgotten_patterns_are_compiled_again) {
  static const char k_pattern[] = "forget";
  forget(k_pattern);
  forget(k_pattern);  // nothing there
  EXPECT_EQ(counts_of([] { get_regex(k_pattern); }), (Counts{0, 1, 0}));
  forget(k_pattern);
  EXPECT_EQ(counts_of([] { get_regex(k_pattern); }), (Counts{0, 1, 0}));
}

TEST(zxstrm, patterns_of_one_slot_take_it_from_each_other) {
  char* const one = room;
  char* const two = place_where([&](const char* p) {
    return slot_of(p) == slot_of(one) && (p - one) % 1024 != 0;
  });
  ASSERT_NE(two, nullptr);
  write(one, "a+");
  write(two, "b+");
  EXPECT_EQ(counts_of([&] {
              for (int i = 0; i < 3; ++i) {
                EXPECT_TRUE(match(zxStr("aabbb"), one));
                EXPECT_EQ(group(0), "aa");
                EXPECT_TRUE(match(zxStr("aabbb"), two));
                EXPECT_EQ(group(0), "bbb");
              }
            }),
            (Counts{0, 6, 0}));
  EXPECT_EQ(counts_of([&] { match(zxStr("aabbb"), two); }), (Counts{1, 0, 0}));
}

TEST(zxstrm, patterns_of_two_slots_stay_side_by_side) {
  char* const one = room;
  char* const two = room + k_half;  // the upper 16 bits differ alone
  ASSERT_NE(slot_of(one), slot_of(two));
  write(one, "a+");
  write(two, "b+");
  EXPECT_EQ(counts_of([&] {
              for (int i = 0; i < 3; ++i) {
                EXPECT_EQ(match(zxStr("aabbb"), one), true);
                EXPECT_EQ(group(0), "aa");
                EXPECT_EQ(match(zxStr("aabbb"), two), true);
                EXPECT_EQ(group(0), "bbb");
              }
            }),
            (Counts{4, 2, 0}));
}

TEST(zxstrm, all_slots_of_the_cache_are_used) {
  // 1024 places in a row with the same upper half have a slot each.
  char* const start = place_where([](const char* p) {
    return (reinterpret_cast<std::uintptr_t>(p) & 0xFFFF) == 0;
  });
  ASSERT_NE(start, nullptr);
  std::memset(start, 'a', 1024);
  for (int i = 0; i < 1024; ++i) forget(start + i);
  const auto use_all = [&] {
    for (int i = 0; i < 1024; ++i) EXPECT_TRUE(match(zxStr("a"), start + i, 1));
  };
  EXPECT_EQ(counts_of(use_all), (Counts{0, 1024, 0}));
  EXPECT_EQ(counts_of(use_all), (Counts{1024, 0, 0}));
}

TEST(zxstrm, forgetting_leaves_the_other_pattern_of_the_slot) {
  char* const one = room;
  char* const two = place_where(
      [&](const char* p) { return p != one && slot_of(p) == slot_of(one); });
  write(one, "a");
  write(two, "b");
  EXPECT_EQ(counts_of([&] {
              get_regex(two);
              forget(one);
              get_regex(two);
            }),
            (Counts{1, 1, 0}));
}

TEST(zxstrm, changed_text_runs_the_old_program_until_it_is_forgotten) {
  char pattern[] = "aa";
  const zxStr subject("aabb");
  forget(pattern);
  ASSERT_TRUE(match(subject, pattern));
  std::strcpy(pattern, "bb");
  EXPECT_TRUE(match(subject, pattern));
  EXPECT_EQ(group(0), "aa");
  EXPECT_TRUE(match_buf(pattern, subject.begin(), subject.end()));
  EXPECT_EQ(group(0), "aa");
  std::strcpy(pattern, "((");  // not even looked at
  EXPECT_TRUE(imatch(subject, pattern));
  EXPECT_EQ(group(0), "aa");

  std::strcpy(pattern, "bb");
  forget(pattern);
  EXPECT_TRUE(match(subject, pattern));
  EXPECT_EQ(group(0), "bb");
  forget(pattern);
}

TEST(zxstrm, the_length_is_no_part_of_the_key) {
  static const char k_pattern[] = "aab";
  const zxStr subject("aaab");
  forget(k_pattern);
  ASSERT_TRUE(match(subject, k_pattern, 1));
  EXPECT_TRUE(match(subject, k_pattern));
  EXPECT_EQ(group(0), "a");
  EXPECT_TRUE(match(subject, k_pattern, 3));
  EXPECT_EQ(group(0), "a");
  forget(k_pattern);
  EXPECT_TRUE(match(subject, k_pattern));
  EXPECT_EQ(group(0), "aab");
}

TEST(zxstrm, strings_whose_text_changes_are_safe_patterns) {
  const zxStr subject("aabbAABB");
  zxStr pattern("aa");
  const char* const address = pattern.c_str();
  ASSERT_TRUE(match(subject, pattern));
  EXPECT_EQ(group(0), "aa");
  for (const char byte : {'b', 'a', 'b'}) {
    pattern.at(0) = pattern.at(1) = byte;
    ASSERT_EQ(pattern.c_str(), address);
    const std::string text(2, byte);
    EXPECT_TRUE(match(subject, pattern));
    EXPECT_EQ(group(0), text);
    EXPECT_TRUE(imatch(subject, pattern));
    EXPECT_EQ(group(0), text);
    EXPECT_TRUE(match_buf(pattern, subject.begin(), subject.end()));
    EXPECT_EQ(group(0), text);
  }
}

TEST(zxstrm, a_string_form_makes_the_plain_form_forget) {
  const zxStr subject("aabb");
  zxStr pattern("aa");
  const char* const address = pattern.c_str();
  ASSERT_TRUE(match(subject, address));
  pattern.at(0) = pattern.at(1) = 'b';
  ASSERT_EQ(pattern.c_str(), address);
  ASSERT_TRUE(match(subject, pattern));
  ASSERT_TRUE(match(subject, address));
  EXPECT_EQ(group(0), "bb");
  forget(address);
}

// Two strings with room inside, one after the other at one place.
TEST(zxstrm, the_address_of_a_dead_string_can_be_used_again) {
  const zxStr subject("aabb");
  std::optional<zxIStr> pattern;
  pattern.emplace("a+");
  const char* const address = pattern->c_str();
  ASSERT_TRUE(match(subject, *pattern));
  EXPECT_EQ(group(0), "aa");

  pattern.emplace("b+");
  ASSERT_EQ(pattern->c_str(), address);
  EXPECT_TRUE(match(subject, *pattern));
  EXPECT_EQ(group(0), "bb");
}

TEST(zxstrm, the_plain_form_takes_a_dead_text_for_the_new_one) {
  const zxStr subject("aabb");
  std::optional<zxIStr> pattern;
  pattern.emplace("a+");
  const char* const address = pattern->c_str();
  forget(address);
  ASSERT_TRUE(match(subject, pattern->c_str()));
  pattern.emplace("b+");
  ASSERT_EQ(pattern->c_str(), address);
  EXPECT_TRUE(match(subject, pattern->c_str()));
  EXPECT_EQ(group(0), "aa");
  forget(address);
}

TEST(zxstrm, many_different_strings_are_patterns) {
  for (int round = 0; round < 2; ++round) {
    for (int i = 0; i < 5000; ++i) {
      const std::string text = std::to_string(i);
      ASSERT_EQ(found("<" + text + ">", "<" + text + ">"), "<" + text + ">");
      ASSERT_EQ(found("<" + text + ">", "<" + text + "x>"), "none");
    }
  }
}

// -------------------------------------------------------------- the flush

TEST(zxstrm, a_flush_forgets_all) {
  static const char k_one[] = "flush(1)";
  static const char k_two[] = "flush(2)";
  const zxStr subject("flush2");
  match(subject, k_one);
  match(subject, k_two);
  EXPECT_EQ(counts_of([] { flush_regex_cache(); }), (Counts{0, 0, 1}));
  EXPECT_EQ(counts_of([] {
              get_regex(k_one);
              get_regex(k_two);
            }),
            (Counts{0, 2, 0}));
  EXPECT_TRUE(match(subject, k_two));
  EXPECT_EQ(group(1), "2");
}

TEST(zxstrm, a_flush_lets_go_of_the_subject_and_unsets_the_groups) {
  const zxStr subject("xa7y");
  ASSERT_TRUE(match(subject, "(a|b)%d"));
  ASSERT_EQ(subject.representation()->refs, 2);
  flush_regex_cache();
  EXPECT_EQ(subject.representation()->refs, 1);
  for (std::int32_t n = 0; n < 12; ++n) {
    EXPECT_EQ(group(n), "") << n;
    EXPECT_EQ(zx_match.start[n], nullptr) << n;
    EXPECT_EQ(alternative(n), -1) << n;
  }
  EXPECT_EQ(field(1), "");
  EXPECT_EQ(field_type(1), '\0');
}

TEST(zxstrm, two_flushes_in_a_row_do_no_harm) {
  EXPECT_EQ(counts_of([] {
              flush_regex_cache();
              flush_regex_cache();
            }),
            (Counts{0, 0, 2}));
  EXPECT_EQ(found("abc", "b"), "b");
}

// The blocks that were taken while they were recorded and not given back; it
// lives as long as the process.
std::set<void*>& blocks() {
  static auto* const set = new std::set<void*>;
  return *set;
}

void* recording_realloc(void* block, std::size_t size) {
  const bool is_recorded = block == nullptr || blocks().erase(block) != 0;
  void* const now = zx_heap_realloc(block, size);
  if (is_recorded && size != 0) blocks().insert(now);
  return now;
}

// Registered ahead of all, it runs behind all.
void report_at_exit() {
  const bool is_flushed = regex_counts().flushes > 1;
  kit::say((is_flushed ? "flushed, " : "not flushed, ") +
           std::to_string(blocks().size()) + " blocks, <" + group(0) + ">");
}

ZX_CASE(zxstrm_end) {
  blocks();
  std::atexit(report_at_exit);
  kit::start();
  // What the matcher keeps for good is taken ahead of the record.
  match(zxStr("abc"), "(x|y|b)*c");
  flush_regex_cache();

  zx_realloc = recording_realloc;
  if (!match(zxStr("abc"), "(b)") || !match(zxStr("abd"), zxStr("b(d)")))
    kit::say("no match! ");
  kit::say(group(1) + (blocks().size() >= 3 ? " held; " : " not held; "));
  return 0;
}

TEST(zxstrm, the_end_of_the_process_flushes) {
  const kit::TempDir folder;
  kit::ProcessOptions options;
  options.directory = folder.path();
  const kit::ProcessResult process = kit::run_case("zxstrm_end", {}, options);
  EXPECT_EQ(process.out, "d held; flushed, 0 blocks, <>");
  EXPECT_EQ(process.exit_code, 0);
}

}  // namespace
