// zxstr2_test.cpp - tests of zxlib/zxstr2.h and zxstr2.cpp: parts of texts,
// searching, prefixes and suffixes, case, escapes, splitting.  Numbers are in
// zxstr2_number_test.cpp.

#include "zxstr2.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "kit/failure.h"
#include "kit/text.h"
#include "regex_random.h"
#include "regex_run.h"
#include "zxstrm.h"

namespace {

using namespace std::string_literals;
using namespace std::string_view_literals;
using Texts = std::vector<std::string>;

using kit::for_all_texts;
using kit::str;
using kit::text_of;
using regex_run::at_the_end_of_memory;
using regex_run::shown;

bool share(const zxStr& a, const zxStr& b) {
  return a.representation() == b.representation();
}

std::string all_bytes() {
  std::string bytes;
  for (int byte = 0; byte < 256; ++byte) bytes += static_cast<char>(byte);
  return bytes;
}

// ------------------------------------------------------------------ parts --

TEST(zxstr2, rest_is_the_text_from_a_position_on) {
  const zxStr text("abcdef");
  EXPECT_EQ(text_of(rest(text, 0)), "abcdef");
  EXPECT_EQ(text_of(rest(text, 2)), "cdef");
  EXPECT_EQ(text_of(rest(text, 5)), "f");
  EXPECT_EQ(text_of(rest(text, 6)), "");
  EXPECT_EQ(text_of(rest(zxStr(), 0)), "");
  EXPECT_EQ(text_of(rest(zxStr("a\0b"sv), 1)), "\0b"s);
}

TEST(zxstr2, rest_outside_of_the_text_is_an_assertion) {
  const zxStr text("abc");
  for (const std::int32_t n : {-1, 4, INT32_MAX, INT32_MIN}) {
    EXPECT_ASSERTION(rest(text, n), "zxstr2");
    kit::with_failures_dropped([&] { EXPECT_TRUE(rest(text, n).is_empty()); });
  }
}

TEST(zxstr2, sub_clips_and_does_not_shorten_for_what_is_ahead) {
  const struct {
    std::int32_t position;
    std::int32_t length;
    std::string_view result;
  } rows[] = {
      {0, 6, "abcdef"},
      {0, 3, "abc"},
      {2, 2, "cd"},
      {5, 1, "f"},
      {4, 10, "ef"},
      {6, 1, ""},
      {7, 1, ""},
      {INT32_MAX, 1, ""},
      {INT32_MAX, INT32_MAX, ""},
      {1, INT32_MAX, "bcdef"},
      {0, INT32_MAX, "abcdef"},
      {2, 0, ""},
      {2, -1, ""},
      {2, INT32_MIN, ""},
      {-3, 2, "ab"},
      {-3, 3, "abc"},
      {-1, 10, "abcdef"},
      {INT32_MIN, 1, "a"},
      {INT32_MIN, INT32_MAX, "abcdef"},
      {-3, 0, ""},
      {-3, -2, ""},
  };
  const zxStr text("abcdef");
  const zxIStr inner("abcdef");
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.position << ", " << row.length);
    EXPECT_EQ(text_of(sub(text, row.position, row.length)), row.result);
    EXPECT_EQ(text_of(sub(inner, row.position, row.length)), row.result);
  }
  EXPECT_TRUE(sub(zxStr(), 0, 1).is_empty());
  EXPECT_TRUE(sub(zxStr(), -1, 1).is_empty());
}

TEST(zxstr2, from_goes_up_to_the_end) {
  const zxStr text("abcdef");
  EXPECT_EQ(text_of(from(text, 0)), "abcdef");
  EXPECT_EQ(text_of(from(text, 4)), "ef");
  EXPECT_EQ(text_of(from(text, 6)), "");
  EXPECT_EQ(text_of(from(text, INT32_MAX)), "");
  EXPECT_EQ(text_of(from(text, -3)), "abcdef");
  EXPECT_EQ(text_of(from(text, INT32_MIN)), "abcdef");
  EXPECT_EQ(text_of(from(zxStr(), 0)), "");
}

TEST(zxstr2, a_part_that_is_all_of_a_text_shares_it) {
  const zxStr text("abc");
  EXPECT_TRUE(share(rest(text, 0), text));
  EXPECT_TRUE(share(sub(text, -1, 3), text));
  EXPECT_TRUE(share(from(text, 0), text));
  EXPECT_FALSE(share(rest(text, 1), text));
  EXPECT_EQ(text.representation()->refs, 1);
}

TEST(zxstr2, a_part_takes_exactly_its_length) {
  zxStr text("abcdef");
  text.reserve(100);
  EXPECT_EQ(rest(text, 2).capacity(), 4);
  EXPECT_EQ(sub(text, 1, 3).capacity(), 3);
  EXPECT_EQ(rest(text, 6).representation(), &zx_empty_rep);
  EXPECT_EQ(sub(text, 1, 0).representation(), &zx_empty_rep);
}

TEST(zxstr2, a_part_of_the_room_inside_an_object_is_copied) {
  zxStr part;
  {
    const zxIStr inner("abc");
    part = rest(inner, 0);
  }
  EXPECT_EQ(text_of(part), "abc");
}

TEST(zxstr2, parts_replace_their_text_and_come_from_temporaries) {
  zxStr text("abcdef");
  text = rest(text, 2);
  EXPECT_EQ(text_of(text), "cdef");
  text = sub(text, 1, 2);
  EXPECT_EQ(text_of(text), "de");
  EXPECT_EQ(text_of(from(zxStr("abc") + "def", 2)), "cdef");
  EXPECT_EQ(text_of(rest("abc", 1)), "bc");
}

TEST(zxstr2, last_char_of_an_empty_text_is_an_assertion) {
  EXPECT_EQ(last_char("abc"), 'c');
  EXPECT_EQ(last_char("a\0"sv), '\0');
  EXPECT_EQ(last_char(zxStr("\xE0")), '\xE0');
  EXPECT_ASSERTION(last_char(""), "zxstr2");
  kit::with_failures_dropped([&] { EXPECT_EQ(last_char(zxStr()), '\0'); });
}

TEST(zxstr2, pop_char_takes_the_last_character_off) {
  zxStr text("abc");
  EXPECT_EQ(pop_char(text), 'c');
  EXPECT_EQ(text_of(text), "ab");
  EXPECT_EQ(pop_char_or0(text), 'b');
  EXPECT_EQ(pop_char(text), 'a');
  EXPECT_TRUE(text.is_empty());
  EXPECT_EQ(pop_char_or0(text), '\0');
  EXPECT_TRUE(text.is_empty());
}

TEST(zxstr2, pop_char_of_an_empty_text_is_an_assertion) {
  zxStr text;
  EXPECT_ASSERTION(pop_char(text), "zxstr2");
  kit::with_failures_dropped([&] { EXPECT_EQ(pop_char(text), '\0'); });
  EXPECT_TRUE(text.is_empty());
}

TEST(zxstr2, pop_char_leaves_the_sharers_alone) {
  zxStr text("abc");
  const zxStr copy = text;
  EXPECT_EQ(pop_char(text), 'c');
  EXPECT_EQ(text_of(text), "ab");
  EXPECT_EQ(text_of(copy), "abc");
  zxIStr inner("ab");
  EXPECT_EQ(pop_char_or0(inner), 'b');
  EXPECT_EQ(text_of(inner), "a");
  EXPECT_EQ(inner.capacity(), zxIStr::k_room);
}

// -------------------------------------------------------------- searching --

TEST(zxstr2, find_gives_the_first_place_at_or_behind_a_position) {
  const struct {
    std::string_view text;
    std::int32_t position;
    std::string_view what;
    std::int32_t place;
  } rows[] = {
      {"abcabc", 0, "abc", 0},
      {"abcabc", 1, "abc", 3},
      {"abcabc", 3, "abc", 3},
      {"abcabc", 4, "abc", -1},
      {"abcabc", 0, "bc", 1},
      {"abcabc", 0, "c", 2},
      {"abcabc", 5, "c", 5},
      {"abcabc", 6, "c", -1},
      {"abcabc", 0, "abd", -1},
      {"abcabc", 0, "abcabc", 0},
      {"abcabc", 0, "abcabcd", -1},
      {"abcabc", INT32_MAX, "abc", -1},
      {"aab", 0, "ab", 1},
      {"aaab", 0, "aab", 1},
      {"abababac", 0, "abac", 4},
      {"ab", 0, "ba", -1},
      {"", 0, "a", -1},
      // NUL bytes and high ones are bytes like any other.
      {"a\0b\0c"sv, 2, "\0c"sv, 3},
      {"a\0b\0c"sv, 0, "\0"sv, 1},
      {"\xE0\xE1\xE2", 0, "\xE1\xE2", 1},
      // An empty text stands everywhere but at the end.
      {"abcabc", 2, "", 2},
      {"abcabc", 0, "", 0},
      {"abcabc", 5, "", 5},
      {"abcabc", 6, "", -1},
      {"abcabc", 7, "", -1},
      {"", 0, "", -1},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << shown(row.text) << ", " << row.position
                                    << ", " << shown(row.what));
    EXPECT_EQ(find(row.text, row.position, row.what), row.place);
    EXPECT_EQ(find(str(row.text), row.position, str(row.what)), row.place);
    EXPECT_EQ(find(row.text, row.position, row.what.data(),
                   zx_count(row.what.size())),
              row.place);
    if (row.position == 0) {
      EXPECT_EQ(find(row.text, row.what), row.place);
      EXPECT_EQ(contains(row.text, row.what), row.place >= 0);
    }
  }
}

// By the definition: the first place where all bytes agree.
std::int32_t slow_find(std::string_view text, std::size_t position,
                       std::string_view what) {
  if (position >= text.size()) return -1;
  for (std::size_t at = position; at + what.size() <= text.size(); ++at) {
    bool agrees = true;
    for (std::size_t i = 0; i < what.size(); ++i)
      agrees = agrees && text[at + i] == what[i];
    if (agrees) return static_cast<std::int32_t>(at);
  }
  return -1;
}

TEST(zxstr2, find_agrees_with_the_slow_model) {
  Texts wanted;
  for_all_texts("ab", 4,
                [&](const std::string& what) { wanted.push_back(what); });
  for_all_texts("ab", 7, [&](const std::string& given) {
    const std::string_view text = at_the_end_of_memory(given);
    for (const std::string& what : wanted)
      for (std::int32_t at = 0; at <= 8; ++at)
        ASSERT_EQ(find(text, at, what.c_str()),
                  slow_find(text, zx_size(at), what))
            << given << ", " << at << ", " << what;
  });
}

TEST(zxstr2, find_char_gives_the_first_place_of_a_byte) {
  const std::string_view text = "abca\0\xE0"sv;
  EXPECT_EQ(find_char(text, 'a'), 0);
  EXPECT_EQ(find_char(text, 1, 'a'), 3);
  EXPECT_EQ(find_char(text, 4, 'a'), -1);
  EXPECT_EQ(find_char(text, '\0'), 4);
  EXPECT_EQ(find_char(text, '\xE0'), 5);
  EXPECT_EQ(find_char(text, 5, '\xE0'), 5);
  EXPECT_EQ(find_char(text, 6, '\xE0'), -1);
  EXPECT_EQ(find_char(text, INT32_MAX, 'a'), -1);
  EXPECT_EQ(find_char("", '\0'), -1);
  EXPECT_EQ(find_char(zxStr("abc"), 'c'), 2);
  EXPECT_TRUE(contains(text, 'c'));
  EXPECT_FALSE(contains(text, 'd'));
  EXPECT_FALSE(contains("", '\0'));
}

TEST(zxstr2, searches_refuse_null_and_negative_numbers) {
  const zxStr text("abc");
  const char* null = nullptr;
  EXPECT_ASSERTION(find(text, -1, "a"), "zxstr2");
  EXPECT_ASSERTION(find(text, INT32_MIN, ""), "zxstr2");
  EXPECT_ASSERTION(find_char(text, -1, 'a'), "zxstr2");
  EXPECT_ASSERTION(find(text, 0, null), "zxstr2");
  EXPECT_ASSERTION(find(text, 0, null, 0), "zxstr2");
  EXPECT_ASSERTION(find(text, 0, "abc", -1), "zxstr2");
  EXPECT_ASSERTION(find(null, "a"), "zxstr2");
  EXPECT_ASSERTION(contains(text, null), "zxstr2");
  EXPECT_ASSERTION(contains(null, 'a'), "zxstr2");
  kit::with_failures_dropped([&] {
    EXPECT_EQ(find(text, -1, "a"), -1);
    EXPECT_EQ(find_char(text, INT32_MIN, 'a'), -1);
    EXPECT_EQ(find(null, "a"), -1);
    EXPECT_EQ(find(text, 1, null), 1);  // as an empty text
    EXPECT_EQ(find(text, 1, "abc", INT32_MIN), 1);
  });
}

TEST(zxstr2, a_corrupt_string_counts_as_empty) {
  zxStr text("abc");
  const_cast<zxStrRep*>(text.representation())->length = 4;
  EXPECT_ASSERTION(find(text, "b"), "zxstr");
  kit::with_failures_dropped([&] {
    EXPECT_EQ(find(text, "b"), -1);
    EXPECT_EQ(parse_long(text), 0);
    EXPECT_TRUE(escape(text, false).is_empty());
    EXPECT_TRUE(unescape(text).is_empty());
    EXPECT_TRUE(sub(text, 0, 2).is_empty());
    EXPECT_EQ(pop_char_or0(text), '\0');
  });
  const_cast<zxStrRep*>(text.representation())->length = 3;
}

// --------------------------------------------------- prefixes and suffixes --

TEST(zxstr2, a_text_starts_and_ends_with_others) {
  const struct {
    std::string_view text;
    std::string_view other;
    bool starts;
    bool istarts;
    bool ends;
    bool iends;
  } rows[] = {
      {"abc", "", true, true, true, true},
      {"", "", true, true, true, true},
      {"", "a", false, false, false, false},
      {"abc", "abc", true, true, true, true},
      {"abc", "abcd", false, false, false, false},
      {"abc", "xabc", false, false, false, false},
      {"abc", "a", true, true, false, false},
      {"abc", "ab", true, true, false, false},
      {"abc", "bc", false, false, true, true},
      {"abc", "b", false, false, false, false},
      {"aBc", "Ab", false, true, false, false},
      {"aBc", "bC", false, false, false, true},
      {"ABC", "abc", false, true, false, true},
      {"abc", "ABC", false, true, false, true},
      // Bytes that differ by 32 and are no letters.
      {"[", "{", false, false, false, false},
      {"@", "`", false, false, false, false},
      {"\xE0", "\xC0", false, false, false, false},
      {"\xE0"
       "a",
       "\xE0"
       "A",
       false, true, false, true},
      // The caseless forms stop at a NUL in both.
      {"a\0b"sv, "a\0b"sv, true, true, true, true},
      {"a\0b"sv, "a\0c"sv, false, true, false, true},
      {"a\0b"sv, "A\0C"sv, false, true, false, true},
      {"a\0b"sv, "ab"sv, false, false, false, false},
      {"xa\0b"sv, "A\0X"sv, false, false, false, true},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(shown(row.text) + ", " + shown(row.other));
    const char* other = row.other.data();
    const std::int32_t size = zx_count(row.other.size());
    EXPECT_EQ(starts_with(row.text, row.other), row.starts);
    EXPECT_EQ(starts_with(row.text, other, size), row.starts);
    EXPECT_EQ(istarts_with(row.text, row.other), row.istarts);
    EXPECT_EQ(istarts_with(row.text, other, size), row.istarts);
    EXPECT_EQ(ends_with(row.text, row.other), row.ends);
    EXPECT_EQ(ends_with(row.text, other, size), row.ends);
    EXPECT_EQ(iends_with(row.text, row.other), row.iends);
    EXPECT_EQ(iends_with(row.text, other, size), row.iends);
  }
  EXPECT_TRUE(starts_with(zxStr("abc"), "ab"));
  EXPECT_TRUE(iends_with(zxStr("abc") + "D", zxStr("cd")));
}

TEST(zxstr2, comparing_stays_within_both_texts) {
  for (const std::string_view given : {"", "a", "ab", "abc"}) {
    const std::string_view text = at_the_end_of_memory(given);
    EXPECT_EQ(istarts_with(text, "ABC"), given == "abc");
    EXPECT_EQ(iends_with(text, "ABC"), given == "abc");
    EXPECT_TRUE(istarts_with("ABC", text));
  }
}

bool same_but_for_case(char a, char b) {
  const auto folded = [](char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c;
  };
  return folded(a) == folded(b);
}

TEST(zxstr2, a_text_starts_and_ends_with_bytes) {
  for (const char a : all_bytes()) {
    for (const char b : all_bytes()) {
      const char text[] = {a, 'x', a};
      ASSERT_EQ(starts_with({text, 2}, b), a == b);
      ASSERT_EQ(istarts_with({text, 2}, b), same_but_for_case(a, b));
      ASSERT_EQ(ends_with({text, 3}, b), a == b);
      ASSERT_EQ(iends_with({text, 3}, b), same_but_for_case(a, b));
      ASSERT_EQ(istarts_with({text, 2}, &b, 1), same_but_for_case(a, b));
    }
  }
  for (const char byte : all_bytes()) {
    EXPECT_FALSE(starts_with("", byte) || istarts_with("", byte));
    EXPECT_FALSE(ends_with("", byte) || iends_with("", byte));
  }
}

TEST(zxstr2, prefixes_and_suffixes_refuse_null_and_negative_lengths) {
  const char* null = nullptr;
  EXPECT_ASSERTION(starts_with("abc", null), "zxstr2");
  EXPECT_ASSERTION(starts_with("abc", null, 0), "zxstr2");
  EXPECT_ASSERTION(istarts_with("abc", "a", -1), "zxstr2");
  EXPECT_ASSERTION(ends_with("abc", null), "zxstr2");
  EXPECT_ASSERTION(iends_with(null, "a"), "zxstr2");
  EXPECT_ASSERTION(ends_with(null, 'a'), "zxstr2");
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(starts_with(null, "a"));
    EXPECT_FALSE(iends_with(null, 'a'));
    EXPECT_TRUE(ends_with("abc", null));  // as an empty text
  });
}

// ------------------------------------------------------------------- case --

TEST(zxstr2, only_ascii_letters_change_their_case) {
  const std::string bytes = all_bytes();
  std::string small = bytes;
  std::string large = bytes;
  for (int letter = 0; letter < 26; ++letter) {
    small[zx_size('A' + letter)] = static_cast<char>('a' + letter);
    large[zx_size('a' + letter)] = static_cast<char>('A' + letter);
  }
  const zxStr text = str(bytes);
  EXPECT_EQ(text_of(lowered(text)), small);
  EXPECT_EQ(text_of(uppered(text)), large);
  EXPECT_EQ(text_of(text), bytes);
  zxStr changed = text;
  lower(changed);
  EXPECT_EQ(text_of(changed), small);
  upper(changed);
  EXPECT_EQ(changed, uppered(text));
  EXPECT_EQ(text_of(text), bytes);
}

TEST(zxstr2, a_text_without_a_letter_to_change_is_shared) {
  const zxStr text("abc 123 \xE0\x80");
  EXPECT_TRUE(share(lowered(text), text));
  EXPECT_FALSE(share(uppered(text), text));
  zxStr copy = text;
  lower(copy);
  EXPECT_TRUE(share(copy, text));
  EXPECT_EQ(lowered(zxStr()).representation(), &zx_empty_rep);
  EXPECT_EQ(text_of(uppered("abc")), "ABC");
}

// ---------------------------------------------------------------- escapes --

std::string slow_escape_of(char byte, bool tilde) {
  switch (byte) {
    case 0:
      return "\\0";
    case 7:
      return "\\a";
    case 8:
      return "\\b";
    case 9:
      return "\\t";
    case 10:
      return "\\n";
    case 12:
      return "\\f";
    case 13:
      return "\\r";
    case '"':
    case '\'':
    case '\\':
      return "\\"s + byte;
    case '~':
      return tilde ? "\\~" : "~";
    default:
      break;
  }
  const auto number = static_cast<unsigned char>(byte);
  if (number >= 32) return std::string(1, byte);
  char text[8];
  std::snprintf(text, sizeof text, "\\x%02X", static_cast<unsigned>(number));
  return text;
}

TEST(zxstr2, escape_writes_each_byte_in_its_form) {
  for (const char byte : all_bytes()) {
    for (const bool tilde : {false, true}) {
      const std::string expected = slow_escape_of(byte, tilde);
      EXPECT_EQ(text_of(escape(zxStr(byte), tilde)), expected);
      EXPECT_EQ(text_of(escape("<" + zxStr(byte) + ">", tilde)),
                "<" + expected + ">");
    }
  }
  EXPECT_EQ(text_of(escape("\x01", false)), "\\x01");
  EXPECT_EQ(text_of(escape("\x0B", false)), "\\x0B");
  EXPECT_EQ(text_of(escape("\x1F", true)), "\\x1F");
  EXPECT_EQ(text_of(escape("\x7F", true)), "\x7F");
  EXPECT_EQ(text_of(escape("\x80\xE0\xFF", true)), "\x80\xE0\xFF");
  EXPECT_EQ(text_of(escape("say \"~\"\r\n", false)), "say \\\"~\\\"\\r\\n");
  EXPECT_EQ(text_of(escape("say \"~\"\r\n", true)), "say \\\"\\~\\\"\\r\\n");
}

TEST(zxstr2, escape_and_unescape_share_what_they_do_not_change) {
  const zxStr text("plain ~ text \xE0");
  EXPECT_TRUE(share(escape(text, false), text));
  EXPECT_FALSE(share(escape(text, true), text));
  EXPECT_TRUE(share(unescape(text), text));
  EXPECT_EQ(escape(zxStr(), true).representation(), &zx_empty_rep);
  EXPECT_EQ(unescape(zxStr()).representation(), &zx_empty_rep);
  EXPECT_EQ(unescape("\\").representation(), &zx_empty_rep);
}

TEST(zxstr2, escape_and_unescape_take_exactly_the_length) {
  const zxStr escaped = escape("a\nb\x01", false);
  EXPECT_EQ(escaped.length(), 8);
  EXPECT_EQ(escaped.capacity(), 8);
  EXPECT_EQ(unescape(escaped).capacity(), 4);
}

TEST(zxstr2, unescape_reads_escapes) {
  const struct {
    std::string_view text;
    std::string_view result;
  } rows[] = {
      {"\\0", "\0"sv},
      {"\\a\\b\\f\\n\\r\\t", "\a\b\f\n\r\t"},
      {"\\\"\\'\\\\\\~", "\"'\\~"},
      // Any other byte gives itself.
      {"\\q", "q"},
      {"\\A\\N\\X41", "ANX41"},
      {"\\1", "1"},
      {"\\\0"sv, "\0"sv},
      {"\\\xE0", "\xE0"},
      {"\\\n", "\n"},
      // Two hexadecimal digits.
      {"\\x41", "A"},
      {"\\x4a\\x4A", "JJ"},
      {"\\x414", "A4"},
      {"\\xff", "\xFF"},
      {"\\x00", "\0"sv},
      {"\\x0Bx", "\x0Bx"},
      // Or what else is read as a hexadecimal number.
      {"\\x1h", "\1"},
      {"\\x1H", "\1"},
      {"\\x 1", "\1"},
      {"\\x  1", "\0001"sv},
      {"\\x0x41", "\00041"sv},
      {"\\xgg", "\0"sv},
      {"\\x1g", "\0"sv},
      {"\\x\\n1", "\0001"sv},
      // Fewer than two at the end.
      {"\\x", "\0"sv},
      {"\\x4", "\4"},
      {"\\xh", "\0"sv},
      // A lone one at the end is dropped.
      {"\\", ""},
      {"a\\", "a"},
      {"\\\\\\", "\\"},
      {"a\\nb\\", "a\nb"},
      // The rest stands for itself.
      {"a\0b\\0"sv, "a\0b\0"sv},
      {"\r\n\xE0\\t", "\r\n\xE0\t"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(text_of(unescape(str(row.text))), row.result) << shown(row.text);
}

std::string slow_unescape(std::string_view text) {
  std::string result;
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (text[i] != '\\') {
      result += text[i];
      continue;
    }
    if (++i == text.size()) break;
    const std::size_t named = "0abfnrt"s.find(text[i]);
    if (named != std::string::npos) {
      result += "\0\a\b\f\n\r\t"s[named];
    } else if (text[i] == 'x') {
      const std::string_view digits = text.substr(i + 1, 2);
      result += static_cast<char>(parse_hex(digits));
      i += digits.size();
    } else {
      result += text[i];
    }
  }
  return result;
}

TEST(zxstr2, unescape_agrees_with_the_slow_model) {
  for_all_texts("\\x1hG n", 6, [](const std::string& text) {
    ASSERT_EQ(text_of(unescape(str(text))), slow_unescape(text)) << text;
  });
}

void expect_escaped_and_back(const std::string& bytes) {
  std::string expected[2];
  for (const char byte : bytes) {
    expected[0] += slow_escape_of(byte, false);
    expected[1] += slow_escape_of(byte, true);
  }
  const zxStr text = str(bytes);
  for (const bool tilde : {false, true}) {
    const zxStr escaped = escape(text, tilde);
    ASSERT_EQ(escaped.view(), expected[tilde ? 1 : 0]);
    ASSERT_EQ(text_of(unescape(escaped)), bytes);
  }
}

TEST(zxstr2, all_short_texts_and_random_ones_are_escaped_and_back) {
  for_all_texts(all_bytes(), 2, expect_escaped_and_back);
  constexpr unsigned k_seed = 60;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (int round = 0; round < 3000; ++round) {
    std::string bytes(random() % 300, '\0');
    for (char& byte : bytes) byte = static_cast<char>(random());
    expect_escaped_and_back(bytes);
  }
}

TEST(zxstr2_slow, escaping_beyond_the_longest_string_is_an_assertion) {
  const zxReallocFunction old = zx_realloc;
  zx_realloc = [](void* block, std::size_t size) -> void* {
    if (block == nullptr) return std::calloc(size, 1);
    if (size != 0) return std::realloc(block, size);
    std::free(block);
    return nullptr;
  };
  constexpr std::int32_t k_length = 0x40000000;  // NULs, which double
  void* probe = std::calloc(k_length + 16U, 1);
  std::free(probe);
  if (probe != nullptr) {
    zxStr text;
    text.reserve(k_length);
    const_cast<zxStrRep*>(text.representation())->length = k_length;
    EXPECT_ASSERTION(escape(text, false), "zxstr2");
    kit::with_failures_dropped(
        [&] { EXPECT_TRUE(escape(text, false).is_empty()); });
  }
  zx_realloc = old;
  if (probe == nullptr) GTEST_SKIP() << "no 1 GiB in one piece here";
}

// -------------------------------------------------------------- splitting --

Texts texts_of(const zxQVA<zxStr>& pieces) {
  Texts texts;
  for (const zxStr& piece : pieces) texts.push_back(text_of(piece));
  return texts;
}

constexpr std::int32_t k_all = INT32_MAX;

// The pieces of a text; patterns are taken by contents.
Texts split(std::string_view text, std::string_view pattern,
            std::int32_t max = k_all, bool keep_empty = false) {
  zxQVA<zxStr> out;
  forget(pattern.data());
  const std::int32_t count =
      split_regex(out, str(text), pattern.data(), zx_count(pattern.size()), max,
                  keep_empty);
  forget(pattern.data());
  EXPECT_EQ(count, out.length());
  return texts_of(out);
}
Texts split_all(std::string_view text, std::string_view pattern,
                std::int32_t max = k_all) {
  return split(text, pattern, max, true);
}

TEST(zxstr2, a_text_is_split_at_the_matches) {
  EXPECT_EQ(split("a,b", ","), (Texts{"a", "b"}));
  EXPECT_EQ(split("a,,b", ","), (Texts{"a", "b"}));
  EXPECT_EQ(split_all("a,,b", ","), (Texts{"a", "", "b"}));
  EXPECT_EQ(split("a; b ;c", " *; *"), (Texts{"a", "b", "c"}));
  EXPECT_EQ(split("abc", ","), (Texts{"abc"}));
  EXPECT_EQ(split("", ","), Texts());
  EXPECT_EQ(split_all("", ","), Texts());
  EXPECT_EQ(split("a\0b\0c"sv, "`000"), (Texts{"a", "b", "c"}));
  EXPECT_EQ(split("\xE0-\xE1", "-"), (Texts{"\xE0", "\xE1"}));
}

TEST(zxstr2, an_empty_last_piece_is_never_added) {
  EXPECT_EQ(split("a,", ","), (Texts{"a"}));
  EXPECT_EQ(split_all("a,", ","), (Texts{"a"}));
  EXPECT_EQ(split_all("a,,", ","), (Texts{"a", ""}));
  EXPECT_EQ(split_all(",a", ","), (Texts{"", "a"}));
  EXPECT_EQ(split(",a", ","), (Texts{"a"}));
  EXPECT_EQ(split_all(",", ","), (Texts{""}));
  EXPECT_EQ(split(",", ","), Texts());
}

TEST(zxstr2, the_last_of_so_many_pieces_is_the_rest) {
  EXPECT_EQ(split("a,b,c", ",", 4), (Texts{"a", "b", "c"}));
  EXPECT_EQ(split("a,b,c", ",", 3), (Texts{"a", "b", "c"}));
  EXPECT_EQ(split("a,b,c", ",", 2), (Texts{"a", "b,c"}));
  EXPECT_EQ(split("a,b,c", ",", 1), (Texts{"a,b,c"}));
  EXPECT_EQ(split("a,b,c", ",", 0), (Texts{"a,b,c"}));
  EXPECT_EQ(split("a,b,c", ",", -1), (Texts{"a,b,c"}));
  EXPECT_EQ(split("a,b,c", ",", INT32_MIN), (Texts{"a,b,c"}));
  EXPECT_EQ(split("", ",", 0), Texts());
  // Separators ahead of the rest are passed over only by a search.
  EXPECT_EQ(split(",,a,,b", ",", 2), (Texts{"a", ",b"}));
  EXPECT_EQ(split_all(",,a,,b", ",", 2), (Texts{"", ",a,,b"}));
}

TEST(zxstr2, groups_that_took_part_are_pieces) {
  EXPECT_EQ(split("a+b-c", "([+-])"), (Texts{"a", "+", "b", "-", "c"}));
  EXPECT_EQ(split("a<1=2>b", "<(.)=(.)>"), (Texts{"a", "1", "2", "b"}));
  EXPECT_EQ(split("a<>b", "<(x*)>"), (Texts{"a", "b"}));
  EXPECT_EQ(split_all("a<>b", "<(x*)>"), (Texts{"a", "", "b"}));
  // Not those that took no part.
  EXPECT_EQ(split_all("a<b>c", "(<)|(>)"), (Texts{"a", "<", "b", ">", "c"}));
  EXPECT_EQ(split_all("a;b", "(x)?;"), (Texts{"a", "b"}));
  EXPECT_EQ(split("-123456789-", "(1)(2)(3)(4)(5)(6)(7)(8)(9)"),
            (Texts{"-", "1", "2", "3", "4", "5", "6", "7", "8", "9", "-"}));
}

TEST(zxstr2, groups_leave_room_for_the_rest) {
  EXPECT_EQ(split("a12b12c", "(1)(2)", 6),
            (Texts{"a", "1", "2", "b", "1", "c"}));
  EXPECT_EQ(split("a12b12c", "(1)(2)", 5), (Texts{"a", "1", "2", "b", "c"}));
  EXPECT_EQ(split("a12b12c", "(1)(2)", 4), (Texts{"a", "1", "2", "b12c"}));
  EXPECT_EQ(split("a12b12c", "(1)(2)", 3), (Texts{"a", "1", "b12c"}));
  EXPECT_EQ(split("a12b12c", "(1)(2)", 2), (Texts{"a", "b12c"}));
  EXPECT_EQ(split("a12b12c", "(1)(2)", 1), (Texts{"a12b12c"}));
}

TEST(zxstr2, empty_matches_split_between_characters) {
  EXPECT_EQ(split("abc", ""), (Texts{"a", "b", "c"}));
  EXPECT_EQ(split_all("abc", ""), (Texts{"a", "b", "c"}));
  EXPECT_EQ(split_all("abc", "x*"), (Texts{"a", "b", "c"}));
  EXPECT_EQ(split_all("axxb", "x*"), (Texts{"a", "b"}));
  EXPECT_EQ(split_all("xxab", "x*"), (Texts{"", "a", "b"}));
  EXPECT_EQ(split("xxab", "x*"), (Texts{"a", "b"}));
  EXPECT_EQ(split("abc", "", 2), (Texts{"a", "bc"}));
  EXPECT_EQ(split("a", ""), (Texts{"a"}));
}

TEST(zxstr2, anchors_and_word_boundaries_know_the_whole_text) {
  EXPECT_EQ(split("ab", "^"), (Texts{"ab"}));
  EXPECT_EQ(split("ab", "^a"), (Texts{"ab"}));
  EXPECT_EQ(split_all("ab", "$"), (Texts{"ab"}));
  EXPECT_EQ(split("ab b", "b$"), (Texts{"ab "}));
  EXPECT_EQ(split("foo,bar", "`b"), (Texts{"foo", ",", "bar"}));
  // The byte ahead of the search counts: no boundary within a word.
  EXPECT_EQ(split("xaab a", "x|`ba"), (Texts{"aab "}));
}

// The steps told one by one, with the library's own search.
Texts slow_split(const zxRegex& regex, std::string_view text, std::int64_t max,
                 bool keep_empty) {
  Texts pieces;
  const auto count = [&] { return static_cast<std::int64_t>(pieces.size()); };
  const char* const start = text.data();
  const char* const end = start + text.size();
  const char* position = start;
  const auto byte_before = [&](const char* place) {
    return place == start ? '\0' : place[-1];
  };
  while (count() < max - 1 && position < end) {
    if (!regexec_from(&regex, position, end, byte_before(position))) break;
    if (zx_match.end[0] == position) {
      const char* next = position + 1;
      if (!regexec_from(&regex, next, end, byte_before(next))) break;
    }
    const std::string piece(position, zx_match.start[0]);
    if (!piece.empty() || keep_empty) pieces.push_back(piece);
    for (int n = 1; n <= 9; ++n) {
      if (zx_match.start[n] == nullptr || zx_match.end[n] == nullptr) continue;
      const std::string group = text_of(group_text(n));
      if ((!group.empty() || keep_empty) && count() < max - 1)
        pieces.push_back(group);
    }
    position = zx_match.end[0];
  }
  if (position < end) pieces.emplace_back(position, end);
  return pieces;
}

void expect_split_of_model(const std::string& text,
                           const std::string& pattern) {
  const regex_run::Program program(pattern);
  for (const std::int32_t max : {0, 1, 2, 3, 4, 7, INT32_MAX}) {
    for (const bool keep_empty : {false, true}) {
      const Texts expected = slow_split(*program.get(), text, max, keep_empty);
      ASSERT_EQ(split(text, pattern, max, keep_empty), expected)
          << shown(pattern) << " on " << shown(text) << ", " << max;
    }
  }
}

TEST(zxstr2, a_pattern_string_is_read_at_each_split) {
  zxQVA<zxStr> out;
  zxStr pattern = ",";
  EXPECT_EQ(split_regex(out, "a,b;c", pattern, 9, false), 2);
  EXPECT_EQ(text_of(out.get(1)), "b;c");
  pattern.at(0) = ';';
  EXPECT_EQ(split_regex(out, "a,b;c", pattern, 9, false), 2);
  EXPECT_EQ(text_of(out.get(0)), "a,b");
  // The pattern is the "c" that this call puts away.
  EXPECT_EQ(split_regex(out, "acb", out.get(1), 9, false), 2);
  EXPECT_EQ(text_of(out.get(1)), "b");
}

TEST(zxstr2, splitting_all_short_texts_agrees_with_the_slow_model) {
  for (const std::string pattern :
       {",", "a", "", "a*", "b?", "(,)", "(a*),", "(a)|(,)", ",(b)?", "`b",
        "`b,", "$", "^", "^a", "a$", "((a)|b)*,", "(a*)(b*)", ".", "(a)(b)|,"})
    for_all_texts("ab,", 5, [&](const std::string& text) {
      expect_split_of_model(text, pattern);
    });
}

void expect_random_splits_of_model(int rounds) {
  constexpr unsigned k_seed = 1717;
  std::printf("seed %u\n", k_seed);
  regex_model::Random random(k_seed);
  // Patterns and texts are short: some take time that doubles with each byte.
  constexpr regex_model::Flavour k_flavour = {.literals = "ab,",
                                              .depth = 2,
                                              .pieces = 3,
                                              .empty = 20,
                                              .byte_class = 1,
                                              .class_letter = 0,
                                              .boundary = 2,
                                              .field = 0};
  for (int round = 0; round < rounds; ++round) {
    const std::string pattern =
        regex_model::PatternWriter(random, k_flavour).pattern();
    if (!regex_run::check(pattern)) continue;
    for (int subject = 0; subject < 4; ++subject) {
      std::string text;
      for (int left = random.below(10); left > 0; --left)
        text += random.of("ab,");
      expect_split_of_model(text, pattern);
    }
  }
}

TEST(zxstr2, splitting_by_random_patterns_agrees_with_the_slow_model) {
  expect_random_splits_of_model(500);
}

TEST(zxstr2_slow, splitting_by_many_random_patterns_agrees_with_the_model) {
  expect_random_splits_of_model(10000);
}

TEST(zxstr2, pieces_replace_what_the_array_held) {
  zxQVA<zxStr> out;
  for (int i = 0; i < 5; ++i) out.append("old");
  EXPECT_EQ(split_regex(out, "a,b", ",", -1, k_all, false), 2);
  EXPECT_EQ(texts_of(out), (Texts{"a", "b"}));
  EXPECT_EQ(split_regex(out, "", ",", -1, k_all, false), 0);
  EXPECT_EQ(texts_of(out), Texts());
}

TEST(zxstr2, the_text_may_be_an_element_of_the_array) {
  zxQVA<zxStr> out;
  out.append("x");
  out.append(zxStr("a,") + "b");  // held by nobody else
  EXPECT_EQ(split_regex(out, out.get(1), ",", -1, k_all, false), 2);
  EXPECT_EQ(texts_of(out), (Texts{"a", "b"}));
}

TEST(zxstr2, the_pattern_may_lie_in_an_element_of_the_array) {
  zxQVA<zxStr> out;
  out.append(zxStr(";") + "+");
  const char* pattern = out.get(0).c_str();
  forget(pattern);
  EXPECT_EQ(split_regex(out, "a;;b", pattern, -1, k_all, false), 2);
  EXPECT_EQ(texts_of(out), (Texts{"a", "b"}));
  forget(pattern);
}

TEST(zxstr2, the_only_piece_shares_the_text) {
  const zxStr text("abc");
  zxQVA<zxStr> out;
  split_regex(out, text, ",", -1, k_all, false);
  EXPECT_TRUE(share(out.get(0), text));
}

TEST(zxstr2, splitting_leaves_no_match_that_outlives_the_text) {
  zxQVA<zxStr> out;
  // The limit is reached at the comma, which was found last.
  EXPECT_EQ(split_regex(out, zxIStr("a,b"), "(,)", -1, 2, false), 2);
  for (int n = 0; n <= 11; ++n) EXPECT_EQ(group_length(n), 0) << n;
  EXPECT_EQ(text_of(group_text(1)), "");
}

TEST(zxstr2, a_bad_pattern_splits_nothing) {
  const zxStr none;
  zxQVA<zxStr> out;
  out.append("old");
  EXPECT_FAILURE(split_regex(out, none, "a(", -1, k_all, false),
                 "1752: regcomp: bad reg 'a('", "[1752-1752-0/E-0/E/a(/]");
  const char* null = nullptr;
  EXPECT_ASSERTION(split_regex(out, none, null, -1, k_all, false), "zxstrm");
  EXPECT_ASSERTION(split_regex(out, none, ",", -2, k_all, false), "zxstrm");
  EXPECT_EQ(texts_of(out), (Texts{"old"}));
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(split_regex(out, "a,b", "a(", -1, k_all, false), 0); });
  EXPECT_EQ(texts_of(out), Texts());
}

}  // namespace
