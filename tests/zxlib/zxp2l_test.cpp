// zxp2l_test.cpp - tests of zxlib/zxp2l.h (zxp2l.cpp): Hebrew reordering in
// both directions and with both base directions, rows worked out by hand and
// a second implementation (hebrew_model.h) on random lines.
//
// The rows read in ASCII: capitals A to Z and & stand for the 27 Hebrew
// letters, < and > for the left-to-right and the right-to-left mark (bytes
// 253 and 254), ~ ^ ` for the classless bytes 251, 252 and 255.  Latin
// letters are small ones.
#include "zxp2l.h"

#include <gtest/gtest.h>

#include <chrono>
#include <initializer_list>
#include <memory>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "hebrew_model.h"
#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "kit/target.h"
#include "kit/text.h"
#include "zxplat.h"

namespace {

using namespace std::string_literals;

// ---- the notation

// A text of the notation with its Hebrew letters from `alef` on.
std::string spelled(std::string_view text, int alef) {
  std::string bytes;
  for (const char c : text) {
    int value = static_cast<unsigned char>(c);
    if (c >= 'A' && c <= 'Z') value = alef + c - 'A';
    if (c == '&') value = alef + 26;
    if (c == '<') value = 253;
    if (c == '>') value = 254;
    if (c == '~') value = 251;
    if (c == '^') value = 252;
    if (c == '`') value = 255;
    bytes += static_cast<char>(value);
  }
  return bytes;
}

std::string dos(std::string_view text) { return spelled(text, 128); }
std::string ansi(std::string_view text) { return spelled(text, 224); }

using kit::str;
std::string std_str(const zxStr& text) { return std::string(text.view()); }

std::string shown_byte(unsigned char value, int alef) {
  constexpr char k_digits[] = "0123456789abcdef";
  if (value >= alef && value < alef + 26)
    return {static_cast<char>('A' + value - alef)};
  if (value == alef + 26) return "&";
  if (value == 253) return "<";
  if (value == 254) return ">";
  if (value == 251) return "~";
  if (value == 252) return "^";
  if (value == 255) return "`";
  if (value >= 32 && value < 127) return {static_cast<char>(value)};
  return {'\\', 'x', k_digits[value / 16], k_digits[value % 16]};
}

// Bytes in the notation, the letters from `alef` on.
std::string shown(const std::string& bytes, int alef) {
  std::string text;
  for (const char c : bytes)
    text += shown_byte(static_cast<unsigned char>(c), alef);
  return text;
}

std::string logical(const std::string& physical, bool rtl) {
  return std_str(logical_from_phys(str(physical), rtl));
}
std::string physical(const std::string& text, bool rtl) {
  return std_str(phys_from_logical(str(text), rtl));
}

// ---- rows

// A line, and what it becomes by the two base directions; null for an
// assertion.
struct Row {
  const char* source;
  const char* rtl;
  const char* ltr;
};

void expect_logical(const char* source, bool rtl, const char* expected) {
  SCOPED_TRACE("'"s + source + (rtl ? "', right to left" : "', left to right"));
  if (expected == nullptr)
    EXPECT_ASSERTION(logical_from_phys(str(dos(source)), rtl), "zxp2l");
  else
    EXPECT_EQ(shown(logical(dos(source), rtl), 224), expected);
}

void expect_all_logical(std::initializer_list<Row> rows) {
  for (const Row& row : rows) {
    expect_logical(row.source, true, row.rtl);
    expect_logical(row.source, false, row.ltr);
  }
}

void expect_all_physical(std::initializer_list<Row> rows) {
  for (const Row& row : rows) {
    SCOPED_TRACE(row.source);
    EXPECT_EQ(shown(physical(ansi(row.source), true), 128), row.rtl);
    EXPECT_EQ(shown(physical(ansi(row.source), false), 128), row.ltr);
  }
}

TEST(zxp2l, hebrew_is_reversed_whole) {
  EXPECT_EQ(logical("\x82\x81\x80", true), "\xE0\xE1\xE2");
  EXPECT_EQ(logical("\x82\x81\x80", false), "\xE0\xE1\xE2");
  expect_all_logical({
      {"", "", ""},
      {"A", "A", "A"},
      {"CBA", "ABC", "ABC"},
      {"CB A", "A BC", "A BC"},
      {"&ZYXWVUTSRQPONMLKJIHGFEDCBA", "ABCDEFGHIJKLMNOPQRSTUVWXYZ&",
       "ABCDEFGHIJKLMNOPQRSTUVWXYZ&"},
  });
}

TEST(zxp2l, letters_of_both_code_pages_are_read) {
  EXPECT_EQ(shown(logical(ansi("CBA"), true), 224), "ABC");
  EXPECT_EQ(shown(logical(dos("B") + ansi("A"), true), 224), "AB");
}

TEST(zxp2l, latin_text_stays_but_its_neutral_ends_change_sides) {
  expect_all_logical({
      {"abc", "abc", "abc"},
      {"abc def, 5 xyz", "abc def, 5 xyz", "abc def, 5 xyz"},
      {"abc.", ".abc", "abc."},
      {".abc", "abc.", ".abc"},
      {"(abc)", "(abc)", "(abc)"},
      {"abc (", ") abc", "abc ("},
      {"abc12", "12abc", "abc12"},
      {"abc 12", "12 abc", "abc 12"},
      {"a1b", "a1b", "a1b"},
  });
}

TEST(zxp2l, a_line_without_letters_runs_in_the_base_direction) {
  expect_all_logical({
      {"12", "12", "12"},
      {"7", "7", "7"},
      {"12 34", "34 12", "12 34"},
      {"( ]", "[ )", "( ]"},
      {"12.5%", "12.5%", "12.5%"},
      {"-5", "5-", "-5"},
      {" ", " ", " "},
  });
}

TEST(zxp2l, numbers_inside_hebrew_keep_their_order) {
  expect_all_logical({
      {"C 12,345.67 A", "A 12,345.67 C", "A 12,345.67 C"},
      {"C12/05/08 10:30A", "A10:30 12/05/08C", "A10:30 12/05/08C"},
      {"C3-5A", "A3-5C", "A3-5C"},
      {"C1+2A", "A1+2C", "A1+2C"},
      {"C1$2A", "A1$2C", "A1$2C"},
      {"C12345678901234567890A", "A12345678901234567890C",
       "A12345678901234567890C"},
      {"C7A", "A7C", "A7C"},
      {"C 1 2 A", "A 2 1 C", "A 2 1 C"},
      {"C12 34A", "A34 12C", "A34 12C"},
  });
}

TEST(zxp2l, a_separator_joins_only_between_digits) {
  expect_all_logical({
      {"C-5A", "A5-C", "A5-C"},
      {"C-50A", "A50-C", "A50-C"},
      {"C.5A", "A5.C", "A5.C"},
      {"C5.A", "A.5C", "A.5C"},
      {"C1,,2A", "A2,,1C", "A2,,1C"},
      {"C10..20A", "A20..10C", "A20..10C"},
      {"C1=2A", "A2=1C", "A2=1C"},
      {"C1 ,2A", "A2, 1C", "A2, 1C"},
  });
}

TEST(zxp2l, a_percent_sign_behind_a_digit_belongs_to_the_number) {
  expect_all_logical({
      {"C50%A", "A50%C", "A50%C"},
      {"C5%A", "A5%C", "A5%C"},
      {"C12.5%A", "A12.5%C", "A12.5%C"},
      {"C%50A", "A50%C", "A50%C"},
      {"C1%2A", "A21%C", "A21%C"},
      {"C5%%A", "A%5%C", "A%5%C"},
      {"C%A", "A%C", "A%C"},
      {"%5", "5%", "%5"},
      {"5%", "5%", "5%"},
  });
}

TEST(zxp2l, a_currency_sign_ahead_belongs_unless_it_starts_the_run) {
  expect_all_logical({
      {"C $12 A", "A $12 C", "A $12 C"},
      {"A$12", "$12A", "A<$12"},
      {"C$5A", "A$5C", "A$5C"},
      {"$12 A", "A 12$", "$12 A"},
      {"$12", "12$", "$12"},
      {"$5", "5$", "$5"},
      {"$$12 A", "A $12$", "$$12 A"},
      {"C$50%A", "A$50%C", "A$50%C"},
      // The start of the run, not of the line.
      {"abc$12 A", "A 12$abc", "abc$12 A"},
  });
}

TEST(zxp2l, a_number_behind_a_written_currency_sign_gets_a_mark) {
  expect_all_logical({
      {"12$ A", "A $>12", "12$ A"},
      {"C12$A", "A$>12C", "A$>12C"},
      {"C5$A", "A$>5C", "A$>5C"},
      // What follows the sign is a sign itself, and no digit.
      {"C$5$A", "A$$5C", "A$$5C"},
      {"C1$$2A", "A$2$>1C", "A$2$>1C"},
      {"C5%$A", "A$>5%C", "A$>5%C"},
  });
}

TEST(zxp2l, brackets_are_exchanged_inside_hebrew) {
  expect_all_logical({
      {"(A)", "(A)", "(A)"},
      {"A(", ")A", "A("},
      {"E)B(A", "A)B(E", "A)B(E"},
      {"E[B}A", "A{B]E", "A{B]E"},
      {"E{B]A", "A[B}E", "A[B}E"},
      {"E/B\\A", "A\\B/E", "A\\B/E"},
  });
  // The other pair of ASCII is none of the six.
  EXPECT_EQ(logical("\x81<\x80>", true), ">\xE0<\xE1");
}

TEST(zxp2l, hebrew_and_a_percentage_in_brackets) {
  EXPECT_EQ(shown(logical(dos("(12.5%) DCBA"), true), 224), "ABCD (12.5%)");
  EXPECT_EQ(shown(logical(dos(".DCBA abc (12.5%) FE"), true), 224),
            "EF (12.5%) abc ABCD.");
}

TEST(zxp2l, latin_and_hebrew_runs_change_places_by_the_base) {
  expect_all_logical({
      {"abc CBA", "ABC abc", "abc ABC"},
      {"CBA abc", "abc ABC", "ABC abc"},
      {"abc B def", "def B abc", "abc B def"},
      {"C.abc", "abc.C", "C.abc"},
      {"abc.C", "C.abc", "abc.C"},
      {"abc 12 A", "A 12 abc", "abc 12 A"},
      {"ab1C", "C1ab", "ab1C"},
      {"DC ab BA xy", "xy AB ab CD", "CD ab AB xy"},
  });
}

TEST(zxp2l, a_number_that_would_join_a_latin_run_is_kept_off_by_a_mark) {
  expect_all_logical({
      // Right to left: the mark 254 stands behind the Latin run.
      {"12 abc", "abc> 12", "12 abc"},
      {"12abc", "abc>12", "12abc"},
      {"A 12 abc", "abc> 12 A", "A< 12 abc"},
      {"C-12abc", "abc>12-C", "C<-12abc"},
      {"12 abc 34", "34 abc> 12", "12 abc 34"},
      {"12 A abc", "abc A 12", "12 A abc"},
      // Left to right: the mark 253 stands ahead of the number's run.
      {"A 12", "12 A", "A< 12"},
      {"A abc 12", "12 abc A", "A< abc 12"},
      {"A x B 12", "12 B x A", "A x B< 12"},
      {"12 A", "A 12", "12 A"},
  });
}

TEST(zxp2l, marks_are_read_as_strong) {
  expect_all_logical({
      {"A<abc", "<abcA", "A<abc"},
      {"abc>A", "Aabc", "abcA"},
      {"A>C", "CA", "CA"},
      {"A 12<x", "<x>12 A", "A< 12<x"},
      {"1>2A", "A21", "1A2"},
      {"$>5A", "A5$", "$A5"},
      {"5$>A", "A$>5", "5$A"},
      {">>", "", nullptr},
      {"<<", nullptr, "<<"},
  });
}

TEST(zxp2l, a_run_against_the_base_without_a_letter_is_an_assertion) {
  expect_all_logical({
      {"<", nullptr, "<"},
      {">", "", nullptr},
      {"A<", nullptr, "A<"},
      {"A< C", nullptr, "A< C"},
      {"A <5", nullptr, "A< <5"},
      {"a>", "a", nullptr},
      {"a> b", "b a", nullptr},
      {"abc>12", "12abc", nullptr},
  });
}

TEST(zxp2l, the_text_so_far_comes_back_from_a_dropped_assertion) {
  kit::with_failures_dropped([] {
    EXPECT_EQ(shown(logical(dos("CBA<"), true), 224), "ABC");
    EXPECT_EQ(shown(logical(dos("abc>"), false), 224), "abc");
    EXPECT_EQ(shown(logical(dos("<"), true), 224), "");
    EXPECT_EQ(std_str(logical_from_phys_lines(
                  str(dos("<") + "\r\n" + dos("BA")), true)),
              "\r\n" + ansi("AB"));
  });
}

TEST(zxp2l, bytes_without_a_class_are_neutral) {
  expect_all_logical({
      {"A~ abc", "abc ~A", "A~ abc"},
      {"abc~", "~abc", "abc~"},
      {"A^B`C", "C`B^A", "C`B^A"},
      {"A\xC8x", "x\\xc8A", "A\\xc8x"},
      {"A\x9Bx", "x\\x9bA", "A\\x9bx"},
      {"A\tB", "B\\x09A", "B\\x09A"},
  });
  EXPECT_EQ(logical("\x81\0\x80"s, true), "\xE0\0\xE1"s);
  EXPECT_EQ(logical("ab\0"s, true), "\0ab"s);
  EXPECT_EQ(physical("\xE0\0\xE1"s, true), "\x81\0\x80"s);
}

TEST(zxp2l, logical_text_goes_back_to_display_order) {
  EXPECT_EQ(physical("\xE0\xE1\xE2", true), "\x82\x81\x80");
  expect_all_physical({
      {"", "", ""},
      {"ABC", "CBA", "CBA"},
      {"ABCDEFGHIJKLMNOPQRSTUVWXYZ&", "&ZYXWVUTSRQPONMLKJIHGFEDCBA",
       "&ZYXWVUTSRQPONMLKJIHGFEDCBA"},
      {"abc", "abc", "abc"},
      {".abc", "abc.", ".abc"},
      {"A 12,345.67 C", "C 12,345.67 A", "C 12,345.67 A"},
      {"A $12 C", "C $12 A", "C $12 A"},
      {"A 50% C", "C 50% A", "C 50% A"},
      {"(A)", "(A)", "(A)"},
      {"A(C", "C)A", "C)A"},
      // A run of the lesser direction keeps its digits here.
      {"abc 12 A", "A abc 12", "abc 12 A"},
      {"A 12 abc", "abc 12 A", "12 A abc"},
      // No mark is added, those there go.
      {"A $12", "$12 A", "$12 A"},
      {"A $>12", "12$ A", "12$ A"},
      {"12$ A", "A $12", "12$ A"},
      {"abc> 12", "12 abc", "abc12 "},
      {"A< 12 abc", " 12 abcA", "A 12 abc"},
      {"A<C", "CA", "AC"},
      {"<", "", ""},
      {">", "", ""},
      {"<>", "", ""},
      {"><", "", ""},
      {"A~ abc", "abc ~A", "A~ abc"},
  });
}

TEST(zxp2l, physical_lines_survive_both_conversions) {
  constexpr const char* k_lines[] = {
      "CBA",      "abc",     "abc.",     ".abc",        "C 12,345.67 A",
      "12$ A",    "$12 A",   "12 abc",   "A 12 abc",    "A abc 12",
      "abc 12 A", "C(12)A",  "C5$A",     "DC ab BA xy", "C1$$2A",
      "A x B 12", "C-12abc", "12 A abc", "(12.5) DCBA", "&7",
  };
  for (const char* line : k_lines)
    for (const bool rtl : {true, false}) {
      SCOPED_TRACE(line + (rtl ? ", right to left"s : ", left to right"s));
      const std::string there = logical(dos(line), rtl);
      EXPECT_EQ(shown(physical(there, rtl), 128), line) << shown(there, 224);
    }
}

TEST(zxp2l, the_source_is_left_alone) {
  const zxStr text = str(dos("CBA 12"));
  const zxStr copy = text;
  logical_from_phys(text, true);
  phys_from_logical(text, true);
  EXPECT_EQ(std_str(copy), dos("CBA 12"));
  EXPECT_EQ(text.representation(), copy.representation());
}

// ---- lines

struct LineRow {
  std::string source;
  std::string rtl;
  std::string ltr;
};

TEST(zxp2l, lines_are_converted_one_by_one) {
  const LineRow k_rows[] = {
      {"", "", ""},
      {"\r\n", "\r\n", "\r\n"},
      {"\r\n\r\n", "\r\n\r\n", "\r\n\r\n"},
      {"CBA\r\nFED", "ABC\r\nDEF", "ABC\r\nDEF"},
      {"\r\nCBA\r\n", "\r\nABC\r\n", "\r\nABC\r\n"},
      {"abc.\r\n\r\n.abc", ".abc\r\n\r\nabc.", "abc.\r\n\r\n.abc"},
      // Nothing of a line shows in the next.
      {"12 abc\r\nxyz", "abc> 12\r\nxyz", "12 abc\r\nxyz"},
      {"A\r\n12", "A\r\n12", "A\r\n12"},
      // A single one of the two bytes is a neutral of its line.
      {"\r\r\n", "\r\r\n", "\r\r\n"},
      {"\n\r\n\r", "\n\r\n\r", "\n\r\n\r"},
      {"BA\r", "\rAB", "AB\r"},
      {"BA\n", "\nAB", "AB\n"},
      {"\nBA", "AB\n", "\nAB"},
      {"abc\r", "\rabc", "abc\r"},
      {"B\n\rA", "A\r\nB", "A\r\nB"},
      {"B\r\r\nA", "\rB\r\nA", "B\r\r\nA"},
  };
  for (const LineRow& row : k_rows) {
    SCOPED_TRACE(shown(row.source, 224));
    const zxStr source = str(dos(row.source));
    EXPECT_EQ(std_str(logical_from_phys_lines(source, true)), ansi(row.rtl));
    EXPECT_EQ(std_str(logical_from_phys_lines(source, false)), ansi(row.ltr));
  }
}

TEST(zxp2l, lines_go_back_to_display_order_one_by_one) {
  const LineRow k_rows[] = {
      {"", "", ""},
      {"\r\n", "\r\n", "\r\n"},
      {"ABC\r\nDEF", "CBA\r\nFED", "CBA\r\nFED"},
      {"\r\n.abc\r\n", "\r\nabc.\r\n", "\r\n.abc\r\n"},
      {"abc> 12\r\nxyz", "12 abc\r\nxyz", "abc12 \r\nxyz"},
      {"\r\r\n", "\r\r\n", "\r\r\n"},
      {"AB\r", "\rBA", "BA\r"},
  };
  for (const LineRow& row : k_rows) {
    SCOPED_TRACE(shown(row.source, 224));
    const zxStr source = str(ansi(row.source));
    EXPECT_EQ(std_str(phys_from_logical_lines(source, true)), dos(row.rtl));
    EXPECT_EQ(std_str(phys_from_logical_lines(source, false)), dos(row.ltr));
  }
}

// A text repeated up to about a megabyte.
std::string repeated(const std::string& piece, int& times) {
  times = 1'000'000 / static_cast<int>(piece.size());
  std::string text;
  for (int i = 0; i < times; ++i) text += piece;
  return text;
}

struct LongRow {
  const char* piece;
  const char* rtl;  // what one piece becomes in a repetition of them
  const char* ltr;
};

// Work that grows with the square of the line would take hours here.
TEST(zxp2l, long_lines_take_time_in_proportion) {
  constexpr LongRow k_rows[] = {
      {"ab CD ", " DC ab", "ab DC "},
      {"a", "a", "a"},
      {"A", "A", "A"},
      {"(", ")", "("},
      {"$", "$", "$"},
      {"5", "5", "5"},
      {"5,", ",5", "5,"},
  };
  const auto start = std::chrono::steady_clock::now();
  for (const LongRow& row : k_rows) {
    SCOPED_TRACE(row.piece);
    int n = 0;
    const std::string source = repeated(dos(row.piece), n);
    std::string rtl, ltr;
    for (int i = 0; i < n; ++i) rtl += ansi(row.rtl), ltr += ansi(row.ltr);
    // The comma behind the last digit alone is no part of the number.
    if (row.piece == "5,"s) rtl = "," + source.substr(0, source.size() - 1);
    EXPECT_TRUE(logical(source, true) == rtl);
    EXPECT_TRUE(logical(source, false) == ltr);
    EXPECT_TRUE(physical(rtl, true) == source);
    EXPECT_TRUE(physical(ltr, false) == source);
  }
  const std::chrono::duration<double> time =
      std::chrono::steady_clock::now() - start;
  EXPECT_LT(time.count(), 20);
}

TEST(zxp2l, many_lines_take_time_in_proportion) {
  int n = 0;
  const std::string source = repeated(dos("BA\r\n"), n);
  const std::string expected = repeated(ansi("AB\r\n"), n);
  const auto start = std::chrono::steady_clock::now();
  EXPECT_TRUE(std_str(logical_from_phys_lines(str(source), true)) == expected);
  const std::chrono::duration<double> time =
      std::chrono::steady_clock::now() - start;
  EXPECT_LT(time.count(), 20);
}

// ---- code pages and Unicode

// The bytes 0 to 255.
std::string all_bytes() {
  std::string bytes;
  for (int i = 0; i < 256; ++i) bytes += static_cast<char>(i);
  return bytes;
}

TEST(zxp2l, letters_change_code_pages_in_place) {
  std::string raised = all_bytes();
  for (int i = 0; i < 27; ++i)
    raised[static_cast<std::size_t>(128 + i)] = static_cast<char>(224 + i);
  zxStr text = str(all_bytes());
  const zxStr copy = text;
  dos_to_ansi(text);
  EXPECT_EQ(std_str(text), raised);
  EXPECT_EQ(std_str(copy), all_bytes());

  std::string lowered = all_bytes();
  for (int i = 0; i < 27; ++i)
    lowered[static_cast<std::size_t>(224 + i)] = static_cast<char>(128 + i);
  text = copy;
  ansi_to_dos(text);
  EXPECT_EQ(std_str(text), lowered);
  EXPECT_EQ(std_str(copy), all_bytes());
}

TEST(zxp2l, nothing_to_change_leaves_a_text_shared) {
  zxStr text = "abc 12";
  const zxStr copy = text;
  dos_to_ansi(text);
  ansi_to_dos(text);
  EXPECT_EQ(text.representation(), copy.representation());
  zxStr empty;
  dos_to_ansi(empty);
  ansi_to_dos(empty);
  EXPECT_TRUE(empty.is_empty());
}

TEST(zxp2l, hebrew_comes_out_in_utf8) {
  EXPECT_EQ(std_str(ansi_to_utf8("")), "");
  EXPECT_EQ(std_str(ansi_to_utf8("a\xE0z")), "a\xD7\x90z");
  EXPECT_EQ(std_str(ansi_to_utf8("\xFA")), "\xD7\xAA");
  // U+0570, U+058B, U+05CF: the bytes below alef.
  EXPECT_EQ(std_str(ansi_to_utf8("\x80\x9B\xDF")), "\xD5\xB0\xD6\x8B\xD7\x8F");
  EXPECT_EQ(std_str(ansi_to_utf8("\xFB\xFC\xFD\xFE\xFF")), "");
  EXPECT_EQ(std_str(ansi_to_utf8("<\xFD>\xFE")), "<>");
}

TEST(zxp2l, every_byte_has_its_utf8) {
  for (int i = 0; i < 256; ++i) {
    SCOPED_TRACE(i);
    const std::string byte(1, static_cast<char>(i));
    std::string expected;
    if (i < 128) {
      expected = byte;
    } else if (i <= 250) {
      const int code = 0x570 + i - 128;
      expected = {static_cast<char>(0xC0 | code / 64),
                  static_cast<char>(0x80 | code % 64)};
    }
    EXPECT_EQ(std_str(ansi_to_utf8(str(byte))), expected);
  }
  EXPECT_EQ(std_str(ansi_to_utf8(str(all_bytes()))),
            hebrew_model::ansi_to_utf8(all_bytes()));
}

TEST(zxp2l, hebrew_comes_out_in_units_of_16_bits) {
  EXPECT_EQ(std_str(ansi_to_utf16("")), "");
  EXPECT_EQ(std_str(dos_to_utf16("")), "");
  EXPECT_EQ(std_str(ansi_to_utf16("a\xE0z")), "a\0\xD0\x05z\0"s);
  EXPECT_EQ(std_str(dos_to_utf16("a\x80z")), "a\0\xD0\x05z\0"s);
  // Tav is the last letter, the marks are behind it.
  EXPECT_EQ(std_str(ansi_to_utf16("\xFA\xFB\xFD\xFE\xFF.")), "\xEA\x05.\0"s);
  EXPECT_EQ(std_str(dos_to_utf16("\x9A\x9B\xE0\xFD\xFE\xFF.")), "\xEA\x05.\0"s);
  // U+0570 is as far below alef as byte 128 is below byte 224.
  EXPECT_EQ(std_str(ansi_to_utf16("\x80")), "\x70\x05"s);
}

// Their results could take twice the length, which must be a length too.
TEST(zxp2l_slow, a_text_of_half_of_all_lengths_is_an_assertion) {
  if (kit::on_windows()) GTEST_SKIP() << "no program of 32 bits has the room";
  constexpr std::int32_t k_length = INT32_MAX / 2 + 1;
  zxStr text;
  text.set_length(k_length);
  using Convert = zxStr (*)(const zxStr&);
  for (const Convert convert : std::initializer_list<Convert>{
           [](const zxStr& t) { return logical_from_phys(t, true); },
           [](const zxStr& t) { return phys_from_logical(t, true); },
           ansi_to_utf8, ansi_to_utf16, dos_to_utf16}) {
    EXPECT_ASSERTION(convert(text), "zxp2l");
    kit::with_failures_dropped([&] { EXPECT_TRUE(convert(text).is_empty()); });
  }
}

// One unit, the low byte first.
std::string unit(int code) {
  return {static_cast<char>(code % 256), static_cast<char>(code / 256)};
}

TEST(zxp2l, every_byte_has_its_unit_of_16_bits) {
  for (int i = 0; i < 256; ++i) {
    SCOPED_TRACE(i);
    const zxStr byte = str(std::string(1, static_cast<char>(i)));
    std::string of_ansi, of_dos;
    if (i < 128) of_ansi = of_dos = unit(i);
    if (i >= 128 && i <= 250) of_ansi = unit(0x570 + i - 128);
    if (i >= 128 && i <= 154) of_dos = unit(0x5D0 + i - 128);
    EXPECT_EQ(std_str(ansi_to_utf16(byte)), of_ansi);
    EXPECT_EQ(std_str(dos_to_utf16(byte)), of_dos);
  }
  EXPECT_EQ(std_str(ansi_to_utf16(str(all_bytes()))),
            hebrew_model::ansi_to_utf16(all_bytes()));
  EXPECT_EQ(std_str(dos_to_utf16(str(all_bytes()))),
            hebrew_model::dos_to_utf16(all_bytes()));
}

TEST(zxp2l, a_long_text_is_converted_whole) {
  const std::string letters(100'000, '\x80');
  std::string units;
  for (std::size_t i = 0; i < letters.size(); ++i) units += "\xD0\x05";
  EXPECT_TRUE(std_str(dos_to_utf16(str(letters))) == units);
}

// ---- the road of exports

// The result of a conversion into room of exactly the size that it may take.
std::string exported(const zxLogicalExport& target, const std::string& text) {
  const std::unique_ptr<char[]> room(
      new char[zxLogicalExport::room_for(text.size())]);
  return std::string(target.convert(room.get(), text));
}

constexpr zxLogicalExport k_whole("");
constexpr zxLogicalExport k_cells("\",5");

TEST(zxp2l, a_field_is_exported_in_utf8) {
  struct Field {
    std::string source;
    std::string expected;
  };
  const Field k_rows[] = {
      {"", ""},
      {"\x82\x81\x80", "\xD7\x90\xD7\x91\xD7\x92"},
      {"\x9A", "\xD7\xAA"},
      {"\x81 12.5% \x80", "\xD7\x90 12.5% \xD7\x91"},
      {"\x81 $12 \x80", "\xD7\x90 $12 \xD7\x91"},
      {"$12 \x80", "\xD7\x90 12$"},
      {"(\x80", "\xD7\x90)"},
      {"abc.", ".abc"},
      {"12 abc", "abc 12"},
      {"\x81\r\n\r\n\x80.", "\xD7\x91\r\n\r\n.\xD7\x90"},
      {"\x81\r", "\r\xD7\x91"},
      {"\x80\xFB\xFE", "\xD7\x90"},
  };
  for (const Field& row : k_rows)
    EXPECT_EQ(exported(k_whole, row.source), row.expected);
}

TEST(zxp2l, bytes_without_room_in_the_target_are_dropped_at_the_end) {
  EXPECT_EQ(exported(k_cells, "a,b\"c"), "abc");
  // They still hold a number together and part it from others.
  EXPECT_EQ(exported(k_cells, "\x81 12,34 \x80"), "\xD7\x90 1234 \xD7\x91");
  EXPECT_EQ(exported(k_cells, "\x81 12\"34 \x80"), "\xD7\x90 3412 \xD7\x91");
  EXPECT_EQ(exported(k_cells, "\x81 1.5% \x80"), "\xD7\x90 1.% \xD7\x91");
  EXPECT_EQ(exported(k_cells, ",\"5"), "");
}

TEST(zxp2l, an_export_fails_and_goes_on_as_the_two_conversions) {
  EXPECT_ASSERTION(exported(k_whole, dos("A<")), "zxp2l");
  kit::with_failures_dropped([] {
    EXPECT_EQ(exported(k_whole, dos("CBA<")), exported(k_whole, dos("CBA")));
    EXPECT_EQ(exported(k_whole, dos("<\r\nBA")),
              "\r\n" + exported(k_whole, dos("BA")));
  });
}

// ---- Windows 95

// On it a percent sign belongs to no number.
constexpr Row k_percent_rows[] = {
    {"C50%A", "A%50C", "A%50C"},
    {"C5%A", "A%5C", "A%5C"},
    {"5%", "%5", "5%"},
    {"C%50A", "A50%C", "A50%C"},
    {"C1%2A", "A2%1C", "A2%1C"},
    {"C5%%A", "A%%5C", "A%%5C"},
    {"C12.5%A", "A%12.5C", "A%12.5C"},
    {"C$50%A", "A%$50C", "A%$50C"},
    // The sign is not next to the number any more, which needs no mark.
    {"C5%$A", "A$%5C", "A$%5C"},
    // Elsewhere nothing is different.
    {"C 12,345.67 A", "A 12,345.67 C", "A 12,345.67 C"},
    {"C12$A", "A$>12C", "A$>12C"},
    {"5% abc", "abc> %5", "5% abc"},
};

// What differs from the rows there, as text.
std::string differences_on_windows_95() {
  std::string found;
  const auto compare = [&](const char* what, const Row& row,
                           const std::string& got, const char* expected) {
    if (got != expected)
      found += what + " of "s + row.source + ": " + got + "\n";
  };
  for (const Row& row : k_percent_rows) {
    compare("rtl", row, shown(logical(dos(row.source), true), 224), row.rtl);
    compare("ltr", row, shown(logical(dos(row.source), false), 224), row.ltr);
  }
  if (physical(ansi("A 50% C"), true) != dos("C %50 A"))
    found += "back to display order\n";
  return found;
}

// The answers that the platform gives in a case, and how often it was asked.
int times_asked = 0;
bool yes() { return ++times_asked > 0; }
bool no() { return ++times_asked < 0; }

ZX_CASE(zxp2l_on_windows_95) {
  times_asked = 0;
  zxplat::process.is_windows_95 = yes;
  std::string said = differences_on_windows_95();
  said += "asked " + std::to_string(times_asked);
  zxplat::process.is_windows_95 = no;
  said +=
      differences_on_windows_95() + "; asked " + std::to_string(times_asked);
  kit::say(said);
  return 0;
}

TEST(zxp2l, on_windows_95_a_percent_sign_belongs_to_no_number) {
  const kit::ProcessResult result = kit::run_case("zxp2l_on_windows_95");
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "asked 1; asked 1");
}

// The same for the road of exports, which may be the first to ask.
ZX_CASE(zxp2l_exports_on_windows_95) {
  times_asked = 0;
  zxplat::process.is_windows_95 = yes;
  std::string said = exported(k_whole, "b 50% a \x80 5%\x81");
  zxplat::process.is_windows_95 = no;
  said += ", " + exported(k_whole, "50%\x80");
  kit::say(said + ", asked " + std::to_string(times_asked));
  return 0;
}

TEST(zxp2l, exports_on_windows_95_are_those_of_its_screens) {
  const kit::ProcessResult result =
      kit::run_case("zxp2l_exports_on_windows_95");
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "\xD7\x91%5 \xD7\x90 b 50% a, \xD7\x90%50, asked 1");
}

// ---- against the model

// The alphabets, each a string from which bytes are drawn alike.
std::vector<std::string> alphabets() {
  return {
      all_bytes(),
      dos("ABCabc123 .,()") + "\r\n",
      dos("Ab1$%,. "),
      dos("A1$"),
      dos("A5%$,"),
      dos("AB&xyz0189 ,/:+-.$%()[]{}\"|"),
      dos("Aab1 <>"),
      dos("AAbb12 .$%(,ABab <> ~`"),
      dos("AB") + ansi("AB&") + "ab 12.$",
      dos("A") + "b1\r\n\r\n",
      "12 .,$%-",
  };
}

class Lines {
 public:
  explicit Lines(unsigned seed) : random(seed), sets(alphabets()) {}

  std::string next() {
    const std::string& set = sets[random() % sets.size()];
    const unsigned longest = random() % 64 == 0 ? 300 : 24;
    std::string line(random() % (longest + 1), '\0');
    for (char& c : line) c = set[random() % set.size()];
    return line;
  }

 private:
  std::mt19937 random;
  std::vector<std::string> sets;
};

using Convert = zxStr (*)(const zxStr&, bool);

// Compares one conversion; false, with a message, if they differ.
bool agrees(const std::string& line, bool rtl, Convert convert,
            const hebrew_model::Maybe& expected) {
  std::string got;
  // The source is made inside: a failure leaves its holders uncounted.
  const kit::Failure failure =
      kit::failure_of([&] { got = std_str(convert(str(line), rtl)); });
  const bool alike = failure.failed
                         ? !expected && kit::is_assertion_of(failure, "zxp2l")
                         : expected && got == *expected;
  if (alike) return true;
  ADD_FAILURE() << "line '" << shown(line, 128) << "', "
                << (rtl ? "right" : "left") << " base\n  expected "
                << (expected ? "'" + shown(*expected, 224) + "'" : "assertion")
                << "\n  got      "
                << (failure.failed ? failure.message
                                   : "'" + shown(got, 224) + "'");
  return false;
}

// The road of exports in the shape of the others; its base is right to left.
zxStr export_cell(const zxStr& text, bool) {
  return str(exported(k_cells, std_str(text)));
}

bool agrees_in_all(const std::string& line) {
  if (!agrees(line, true, export_cell, hebrew_model::exported(line, "\",5")))
    return false;
  for (const bool rtl : {true, false})
    if (!agrees(line, rtl, logical_from_phys,
                hebrew_model::logical_from_phys(line, rtl)) ||
        !agrees(line, rtl, phys_from_logical,
                hebrew_model::phys_from_logical(line, rtl)))
      return false;
  return true;
}

bool agrees_in_all_as_lines(const std::string& text) {
  for (const bool rtl : {true, false})
    if (!agrees(text, rtl, logical_from_phys_lines,
                hebrew_model::logical_from_phys_lines(text, rtl)) ||
        !agrees(text, rtl, phys_from_logical_lines,
                hebrew_model::phys_from_logical_lines(text, rtl)))
      return false;
  const zxStr source = str(text);
  return std_str(ansi_to_utf8(source)) == hebrew_model::ansi_to_utf8(text) &&
         std_str(ansi_to_utf16(source)) == hebrew_model::ansi_to_utf16(text) &&
         std_str(dos_to_utf16(source)) == hebrew_model::dos_to_utf16(text);
}

void compare_random_lines(int count, unsigned seed) {
  Lines lines(seed);
  for (int i = 0; i < count; ++i) {
    const std::string line = lines.next();
    if (!agrees_in_all(line)) return;
    if (i % 8 == 0 && !agrees_in_all_as_lines(line))
      FAIL() << "as lines or in Unicode: '" << shown(line, 128) << "'";
  }
}

TEST(zxp2l, random_lines_agree_with_the_model) {
  compare_random_lines(200'000, 1);
}

// Every line of up to five bytes of a small alphabet.
TEST(zxp2l, all_short_lines_agree_with_the_model) {
  const std::string set = dos("Ab1$%,<>");
  for (std::size_t length = 0; length <= 5; ++length) {
    std::size_t count = 1;
    for (std::size_t i = 0; i < length; ++i) count *= set.size();
    for (std::size_t number = 0; number < count; ++number) {
      std::string line;
      std::size_t rest = number;
      for (std::size_t i = 0; i < length; ++i, rest /= set.size())
        line += set[rest % set.size()];
      if (!agrees_in_all(line)) return;
    }
  }
}

// True if a line without failures has the results of the model.
bool agrees_on_windows_95(const std::string& line) {
  constexpr auto k_system = hebrew_model::System::windows_95;
  for (const bool rtl : {true, false}) {
    const auto there = hebrew_model::logical_from_phys(line, rtl, k_system);
    if (there && logical(line, rtl) != *there) return false;
    const auto back = hebrew_model::phys_from_logical(line, rtl, k_system);
    if (physical(line, rtl) != back) return false;
  }
  const auto cell = hebrew_model::exported(line, "\",5", k_system);
  return !cell || exported(k_cells, line) == *cell;
}

ZX_CASE(zxp2l_random_lines_on_windows_95) {
  zxplat::process.is_windows_95 = yes;
  Lines lines(3);
  for (int i = 0; i < 50'000; ++i) {
    const std::string line = lines.next();
    if (agrees_on_windows_95(line)) continue;
    kit::say(shown(line, 128));
    return 1;
  }
  return 0;
}

TEST(zxp2l, random_lines_on_windows_95_agree_with_the_model) {
  const kit::ProcessResult result =
      kit::run_case("zxp2l_random_lines_on_windows_95");
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "");
}

TEST(zxp2l_slow, millions_of_random_lines_agree_with_the_model) {
  compare_random_lines(5'000'000, 2);
}

}  // namespace
