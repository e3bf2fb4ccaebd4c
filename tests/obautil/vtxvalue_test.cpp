// Tests of the values of a table's text: obautil/mkvtx/vtxvalue.h, .cpp.
#include "vtxvalue.h"

#include <gtest/gtest.h>

#include <climits>
#include <string>

#include "zxmisc.h"

namespace {

std::string plain(const zxStr& text) { return std::string(text.view()); }

// Capitals stand for the letters from alef on ("[" is tav), < and > for the
// left-to-right and the right-to-left mark.
std::string hebrew(const std::string& text) {
  std::string utf8;
  for (const char c : text) {
    if (c >= 'A' && c <= '[') {
      utf8 += '\xD7';
      utf8 += static_cast<char>(0x90 + (c - 'A'));
    } else if (c == '<' || c == '>') {
      utf8 += c == '<' ? "\xE2\x80\x8E" : "\xE2\x80\x8F";
    } else {
      utf8 += c;
    }
  }
  return utf8;
}

// Stored bytes in the same notation.
std::string stored_bytes(const std::string& text, int alef) {
  std::string bytes;
  for (const char c : text)
    bytes += c >= 'A' && c <= '[' ? static_cast<char>(alef + (c - 'A')) : c;
  return bytes;
}

// ---- numbers

TEST(vtxvalue, each_notation_of_a_number_gives_its_word) {
  const struct {
    const char* text;
    std::int32_t word;
  } rows[] = {
      {"0", 0},
      {"-0", 0},
      {"0.0", 0},
      {"1", 2},
      {"+7", 14},
      {"-1", -2},
      {"007", 14},
      {"2000000", 4000000},
      {"0.5", 50 * 4 + 3},
      {"1.5", 150 * 4 + 3},
      {"200.25", 20025 * 4 + 3},
      {"-0.01", -1},
      {"12.50", 1250 * 4 + 3},
      {"0.12345678", 12345678 * 16 + 9},
      {"0.123456", 123456 * 16 + 5},
      {"12.3456", 123456 * 16 + 1},
      {"2000000.5", 200000050 * 4 + 3},
      {"0.123456789", 12345679 * 16 + 9},
      {"6000000.5", 6000001 * 2},
      {"1234567890", 1234568 * 16 + 13},
      {"99999999999", 100000000 * 16 + 13},
      {"-99999999999.9", -100000000 * 16 + 13},

      {"1/64", 403},
      {"-1/64", -397},
      {"+1/64", 403},
      {"63/64", 63 * 400 + 3},
      {"0/64", 3},
      {"12 3/64", (12 * 64 + 3) * 400 + 3},
      {"-12 3/64", -(12 * 64 + 3) * 400 + 3},
      {"12 \t 3/64", (12 * 64 + 3) * 400 + 3},
      {"7 0/64", 7 * 64 * 400 + 3},
      {"79999 63/64", 2047999603},

      {"integer 5", 10},
      {"integer  -5.00", -10},
      {"integer 1073741823", 2147483646},
      {"integer -1073741824", INT32_MIN},
      {"hundredths 12.51", 5007},
      {"hundredths 12.5100", 5007},
      {"hundredths 0.01", 7},
      {"hundredths -0.01", -1},
      {"hundredths 5368709.11", INT32_MAX},
      {"hundredths -5368709.12", INT32_MIN + 3},
      {"ten-thousandths 1", 160001},
      {"ten-thousandths 0", 1},
      {"ten-thousandths 13421.7727", 134217727 * 16 + 1},
      {"ten-thousandths -13421.7728", INT32_MIN + 1},
      {"millionths 0.5", 500000 * 16 + 5},
      {"millionths 134.217727", 134217727 * 16 + 5},
      {"hundred-millionths 0.00000001", 25},
      {"hundred-millionths -1.34217728", INT32_MIN + 9},
      {"thousands 1000", 29},
      {"thousands -1000", -3},
      {"thousands 0", 13},
      {"thousands 134217727000", 134217727 * 16 + 13},
      {"small 7", 1120001},
      {"small 0", 1},
      {"small 9999", 1599840001},
      {"small -9999", -1599839999},

      {"0x0", 0},
      {"0x193", 403},
      {"0xFFFFFFFE", -2},
      {"0x7fffffff", INT32_MAX},
      {"0x00000007", 7},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    HvlDecimal number = HvlDecimal::from_word(99);
    zxStr wrong;
    EXPECT_TRUE(number_value(row.text, number, wrong)) << plain(wrong);
    EXPECT_EQ(number.word(), row.word);
  }
}

TEST(vtxvalue, a_bad_number_is_told_and_leaves_the_value_alone) {
  const struct {
    const char* text;
    const char* wrong;
  } rows[] = {
      {"", "'' is no number"},
      {"-", "'-' is no number"},
      {"abc", "'abc' is no number"},
      {"1,000", "'1,000' is no number"},
      {".5", "'.5' is no number"},
      {"5.", "'5.' is no number"},
      {"1e5", "'1e5' is no number"},
      {"--1", "'--1' is no number"},
      {"1 2", "'1 2' is no number"},
      {"inf", "'inf' is no number"},
      {"nan", "'nan' is no number"},
      {"100000000000",
       "'100000000000' is out of range: the limit is 100000000000"},
      {"-100000000000.5",
       "'-100000000000.5' is out of range: the limit is 100000000000"},

      {"/64", "'/64' is no number"},
      {"1/32", "'1/32' is no number"},
      {"1 /64", "'1 /64' is no number"},
      {"- 1/64", "'- 1/64' is no number"},
      {"1 -1/64", "'1 -1/64' is no number"},
      {"1.5 1/64", "'1.5 1/64' is no number"},
      {"1 2 3/64", "'1 2 3/64' is no number"},
      {"64/64", "'64/64' can't be stored as sixty-fourths"},
      {"80000 0/64", "'80000 0/64' can't be stored as sixty-fourths"},
      {"9999999999999 1/64", "'9999999999999 1/64' is no number"},

      {"integer", "'' is no number"},
      {"integer x", "'x' is no number"},
      {"integer 0.5", "'0.5' can't be stored as integer"},
      {"integer 1073741824", "'1073741824' can't be stored as integer"},
      {"integer -1073741825", "'-1073741825' can't be stored as integer"},
      {"hundredths 0.015", "'0.015' can't be stored as hundredths"},
      {"hundredths 12", "'12' can't be stored as hundredths"},
      {"hundredths 0", "'0' can't be stored as hundredths"},
      {"hundredths 5368709.13", "'5368709.13' can't be stored as hundredths"},
      {"ten-thousandths 13421.7728",
       "'13421.7728' can't be stored as ten-thousandths"},
      {"millionths 134.217728", "'134.217728' can't be stored as millionths"},
      {"hundred-millionths 0.000000001",
       "'0.000000001' can't be stored as hundred-millionths"},
      {"hundred-millionths 99999999999999999999",
       "'99999999999999999999' can't be stored as hundred-millionths"},
      {"thousands 1500", "'1500' can't be stored as thousands"},
      {"thousands 134217728000", "'134217728000' can't be stored as thousands"},
      {"small 10000", "'10000' is no whole number from -9999 to 9999"},
      {"small -10000", "'-10000' is no whole number from -9999 to 9999"},
      {"small 0.5", "'0.5' is no whole number from -9999 to 9999"},

      {"0x", "'0x' is no word of 32 bits"},
      {"0x100000000", "'0x100000000' is no word of 32 bits"},
      {"0x12G", "'0x12G' is no word of 32 bits"},
      {"0x-1", "'0x-1' is no word of 32 bits"},
      {"-0x1", "'-0x1' is no number"},
      {"0X1", "'0X1' is no number"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    HvlDecimal number = HvlDecimal::from_word(99);
    zxStr wrong;
    EXPECT_FALSE(number_value(row.text, number, wrong));
    EXPECT_EQ(plain(wrong), row.wrong);
    EXPECT_EQ(number.word(), 99);
  }
}

TEST(vtxvalue, a_number_of_many_digits_is_none_the_less_a_number) {
  const std::string zeros(5000, '0');
  HvlDecimal number;
  zxStr wrong;
  EXPECT_TRUE(number_value(zeros + "12.5", number, wrong)) << plain(wrong);
  EXPECT_EQ(number.word(), 1250 * 4 + 3);
  EXPECT_TRUE(number_value("0." + zeros + "1", number, wrong)) << plain(wrong);
  EXPECT_EQ(number.word(), 0);
  EXPECT_FALSE(number_value("1" + zeros, number, wrong));
  EXPECT_EQ(plain(wrong),
            "'100000000000000000000000...' is out of range: the limit is "
            "100000000000");
}

// ---- whole numbers, code pages

TEST(vtxvalue, a_whole_number_lies_within_its_range) {
  const struct {
    const char* text;
    bool is_good;
    std::int64_t value;
  } rows[] = {
      {"0", true, 0},
      {"-5", true, -5},
      {"+10", true, 10},
      {"010", true, 10},
      {"10", true, 10},
      {"11", false, 99},
      {"-6", false, 99},
      {"", false, 99},
      {"-", false, 99},
      {"1.0", false, 99},
      {"5 5", false, 99},
      {"0x1", false, 99},
      {"99999999999999999999", false, 99},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    std::int64_t value = 99;
    zxStr wrong;
    EXPECT_EQ(whole_value(row.text, -5, 10, value, wrong), row.is_good);
    EXPECT_EQ(value, row.value);
    if (!row.is_good) {
      EXPECT_EQ(plain(wrong), "'" + std::string(row.text) +
                                  "' is no whole number from -5 to 10");
    }
  }
}

TEST(vtxvalue, a_code_page_goes_by_its_number) {
  VtxCodePage page = VtxCodePage::windows;
  zxStr wrong;
  EXPECT_TRUE(code_page_value("862", page, wrong));
  EXPECT_EQ(page, VtxCodePage::dos);
  EXPECT_TRUE(code_page_value("1255", page, wrong));
  EXPECT_EQ(page, VtxCodePage::windows);
  EXPECT_FALSE(code_page_value("dos", page, wrong));
  EXPECT_EQ(plain(wrong), "'dos' is no code page: 862 or 1255");
  EXPECT_EQ(page, VtxCodePage::windows);
}

// ---- dates

TEST(vtxvalue, a_date_is_stored_as_its_days) {
  const struct {
    const char* text;
    int days;
  } rows[] = {
      {"1970-01-01", 0},     {"1970-01-31", 30},    {"1970-02-01", 31},
      {"1970-12-31", 364},   {"1971-01-01", 365},   {"1972-02-29", 789},
      {"1972-03-01", 790},   {"2000-01-01", 10957}, {"2000-02-29", 11016},
      {"2057-12-31", 32141},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    zxDate date;
    zxStr wrong;
    EXPECT_TRUE(date_value(row.text, date, wrong)) << plain(wrong);
    EXPECT_EQ(date.days(), row.days);
  }
}

TEST(vtxvalue, a_date_that_the_calendar_does_not_have_is_told) {
  for (const char* text :
       {"", "1969-12-31", "2058-01-01", "2001-02-29", "2000-02-30",
        "2001-04-31", "2001-13-01", "2001-00-01", "2001-01-00", "2001-01-32",
        "9999-99-99", "0000-00-00", "01-01-2001", "2001/01/01", "2001-1-1",
        "2001-01-01x", "2001-01-0a", "+001-01-01"}) {
    SCOPED_TRACE(text);
    zxDate date = zxDate::from_stored(5);
    zxStr wrong;
    EXPECT_FALSE(date_value(text, date, wrong));
    EXPECT_EQ(plain(wrong), "'" + std::string(text) +
                                "' is no date from 1970-01-01 to 2057-12-31");
    EXPECT_EQ(date.days(), 5);
  }
}

// ---- texts

TEST(vtxvalue, a_text_is_stored_in_display_order) {
  const struct {
    const char* text;
    const char* stored;
  } rows[] = {
      {"", ""},
      {"ABC", "CBA"},
      {"A[", "[A"},
      {"abc", "abc"},
      {"abc.", ".abc"},
      {"AB CD", "DC BA"},
      {"AB 12 CD", "DC 12 BA"},
      {"AB 12,345.67", "12,345.67 BA"},
      {"A 12.5%", "12.5% A"},
      {"A $12", "$12 A"},
      {"A (BC)", "(CB) A"},
      {"AB abc CD", "DC abc BA"},
      {"A\"B", "B\"A"},
      {"A\tB", "B\tA"},
      {"abc 3 A", "A abc 3"},
      {"abc> 3 A", "A 3 abc"},
      {"a<b", "ab"},
      {">", ""},
      {"<", ""},
      // Quotes around all of it go.
      {"\"\"", ""},
      {"\" A \"", " A "},
      {"\"\"A\"\"", "\"A\""},
      {"\"", "\""},
      {"\"A\" B", "B \"A\""},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    zxStr stored = "old";
    zxStr wrong;
    const std::string text = hebrew(row.text);
    EXPECT_TRUE(text_value(text, VtxCodePage::dos, 64, stored, wrong))
        << plain(wrong);
    EXPECT_EQ(plain(stored), stored_bytes(row.stored, 128));
    EXPECT_TRUE(text_value(text, VtxCodePage::windows, 64, stored, wrong));
    EXPECT_EQ(plain(stored), stored_bytes(row.stored, 224));
  }
}

TEST(vtxvalue, a_text_that_cannot_be_stored_is_told) {
  const struct {
    const char* text;
    const char* wrong;
  } rows[] = {
      {"a\x01z", "the character U+0001 can't be stored"},
      {"a\rz", "the character U+000D can't be stored"},
      {"\x7F", "the character U+007F can't be stored"},
      {"\xC2\x80", "the character U+0080 can't be stored"},
      {"\xC3\xA9", "the character U+00E9 can't be stored"},
      {"\xD7\x8F", "the character U+05CF can't be stored"},
      {"\xD7\xAB", "the character U+05EB can't be stored"},
      {"\xD6\xB8", "the character U+05B8 can't be stored"},
      {"\xE2\x82\xAC", "the character U+20AC can't be stored"},
      {"\xF0\x9F\x98\x80", "the character U+1F600 can't be stored"},
      {"\xF4\x8F\xBF\xBF", "the character U+10FFFF can't be stored"},
      {"\xFF", "the text is not UTF-8"},
      {"abcdef", "the text has 6 characters, 5 can be stored"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    zxStr stored = "old";
    zxStr wrong;
    EXPECT_FALSE(text_value(row.text, VtxCodePage::dos, 5, stored, wrong));
    EXPECT_EQ(plain(wrong), row.wrong);
    EXPECT_EQ(plain(stored), "old");
  }
}

TEST(vtxvalue, a_nul_is_a_character_that_cannot_be_stored) {
  zxStr stored;
  zxStr wrong;
  EXPECT_FALSE(text_value({"a\0z", 3}, VtxCodePage::dos, 64, stored, wrong));
  EXPECT_EQ(plain(wrong), "the character U+0000 can't be stored");
}

TEST(vtxvalue, a_text_may_fill_its_room_and_no_more) {
  zxStr stored;
  zxStr wrong;
  EXPECT_TRUE(text_value(hebrew("ABCDE"), VtxCodePage::dos, 5, stored, wrong));
  EXPECT_TRUE(text_value(hebrew("ABCDE>"), VtxCodePage::dos, 5, stored, wrong));
  EXPECT_TRUE(text_value("\"abcde\"", VtxCodePage::dos, 5, stored, wrong));
  EXPECT_EQ(plain(stored), "abcde");
}

// ---- UTF-8 and words

TEST(vtxvalue, what_is_utf8) {
  const struct {
    std::string_view bytes;
    bool is_good;
  } rows[] = {
      {"", true},
      {"abc", true},
      {{"\0", 1}, true},
      {"\x7F", true},
      {"\xC2\x80", true},
      {"\xDF\xBF", true},
      {"\xE0\xA0\x80", true},
      {"\xED\x9F\xBF", true},
      {"\xEE\x80\x80", true},
      {"\xEF\xBF\xBF", true},
      {"\xF0\x90\x80\x80", true},
      {"\xF4\x8F\xBF\xBF", true},
      // A continuation without a lead, leads without continuations.
      {"\x80", false},
      {"\xBF", false},
      {"\xC2", false},
      {"\xC2z", false},
      {"\xC2\xC2", false},
      {"\xE2\x82", false},
      {"\xE2z\xAC", false},
      {"\xF0\x9F\x98", false},
      // Longer than need be.
      {"\xC0\x80", false},
      {"\xC1\xBF", false},
      {"\xE0\x9F\xBF", false},
      {"\xF0\x8F\xBF\xBF", false},
      // Surrogates, and what lies behind the last character.
      {"\xED\xA0\x80", false},
      {"\xED\xBF\xBF", false},
      {"\xF4\x90\x80\x80", false},
      {"\xF5\x80\x80\x80", false},
      {"\xF8\x88\x80\x80\x80", false},
      {"\xFE", false},
      {"\xFF", false},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::PrintToString(row.bytes));
    EXPECT_EQ(is_utf8(row.bytes), row.is_good);
    const std::string within = "ab" + std::string(row.bytes) + "yz";
    EXPECT_EQ(is_utf8(within), row.is_good);
  }
}

TEST(vtxvalue, a_quoted_word_is_short_and_printable) {
  const struct {
    std::string text;
    std::string quoted;
  } rows[] = {
      {"", "''"},
      {"abc", "'abc'"},
      {{"a\0\x01\x7F\tb", 6}, "'a????b'"},
      {std::string(24, 'x'), "'" + std::string(24, 'x') + "'"},
      {std::string(25, 'x'), "'" + std::string(24, 'x') + "...'"},
      // A letter of two bytes is not cut in half.
      {"x" + hebrew("ABCDEFGHIJKLM"), "'x" + hebrew("ABCDEFGHIJK") + "...'"},
      {std::string(30, '\x80'), "'...'"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    EXPECT_EQ(plain(quoted_word(row.text)), row.quoted);
  }
}

TEST(vtxvalue, words_are_taken_off_the_front) {
  std::string_view text = zx_trimmed(" \t one \t two  three\r");
  EXPECT_EQ(take_word(text), "one");
  EXPECT_EQ(text, "two  three");
  EXPECT_EQ(take_word(text), "two");
  EXPECT_EQ(take_word(text), "three");
  EXPECT_EQ(text, "");
  EXPECT_EQ(take_word(text), "");
  EXPECT_EQ(zx_trimmed(" \t\r "), "");
}

}  // namespace
