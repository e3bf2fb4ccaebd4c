// zxtext_test.cpp - text in a buffer of fixed size: cuts, numbers, addresses.
#include "zxtext.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <span>
#include <string_view>

namespace {

using namespace std::string_view_literals;

// A buffer of which only the part in the middle may be written to.
struct Fenced {
  char before[8];
  char room[8];
  char behind[8];

  Fenced() { std::fill_n(before, sizeof *this, '#'); }
  bool is_intact() const {
    return std::string_view(before, 8) == "########" &&
           std::string_view(behind, 8) == "########";
  }
};

TEST(zxtext, text_that_does_not_fit_is_cut) {
  const struct {
    std::size_t size;
    const char* pieces[3];
    const char* text;
  } rows[] = {
      {1, {"", "", ""}, ""},
      {1, {"a", "bc", ""}, ""},
      {2, {"a", "bc", ""}, "a"},
      {2, {"abc", "", ""}, "a"},
      {8, {"abc", "def", ""}, "abcdef"},
      {8, {"abc", "def", "g"}, "abcdefg"},
      {8, {"abc", "def", "gh"}, "abcdefg"},
      {8, {"abcdefg", "h", "i"}, "abcdefg"},
      {8, {"abcdefgh", "i", ""}, "abcdefg"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    Fenced fenced;
    zxText text(std::span(fenced.room, row.size));
    EXPECT_EQ(text.view(), "");
    for (const char* piece : row.pieces) text.add(piece);
    EXPECT_EQ(text.view(), row.text);
    EXPECT_EQ(text.length(), std::string_view(row.text).size());
    EXPECT_STREQ(fenced.room, row.text);
    EXPECT_TRUE(fenced.is_intact());
  }
}

TEST(zxtext, text_begins_behind_what_stays_of_the_buffer) {
  const struct {
    std::size_t length;
    const char* text;
  } rows[] = {
      {0, "xy"},      {1, "axy"},     {5, "abcdexy"}, {6, "abcdefx"},
      {7, "abcdefg"}, {8, "abcdefg"}, {9, "abcdefg"}, {SIZE_MAX, "abcdefg"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.length);
    Fenced fenced;
    std::copy_n("abcdefgh", 8, fenced.room);
    zxText text(fenced.room, row.length);
    text.add("xy");
    EXPECT_EQ(text.view(), row.text);
    EXPECT_STREQ(fenced.room, row.text);
    EXPECT_TRUE(fenced.is_intact());
  }
}

TEST(zxtext, text_can_be_cut_to_a_number_of_bytes) {
  char room[32];
  zxText text(room);
  text.add("abcdef", 3);
  text.add("ghi", 3);
  text.add("jk", 3);
  text.add("lost", 0);
  EXPECT_EQ(text.view(), "abcghijk");
}

TEST(zxtext, text_takes_numbers) {
  char room[64];
  zxText text(room);
  for (const std::int32_t number : {0, -1, 42, INT32_MAX, INT32_MIN}) {
    text.add_int(number);
    text.add(" ");
  }
  EXPECT_EQ(text.view(), "0 -1 42 2147483647 -2147483648 ");
  Fenced fenced;
  zxText cut(fenced.room);
  cut.add_int(INT32_MIN);
  EXPECT_EQ(cut.view(), "-214748");
  EXPECT_TRUE(fenced.is_intact());
}

TEST(zxtext, text_takes_nul_bytes_and_views_of_nothing) {
  char room[16];
  zxText text(room);
  text.add(std::string_view());
  text.add("a\0b"sv);
  text.add(std::string_view(), 5);
  EXPECT_EQ(text.view(), "a\0b"sv);
}

TEST(zxtext, numbers_can_have_a_width) {
  char room[64];
  zxText text(room);
  for (const std::int32_t number : {0, 9, 10, 999, -1, -10}) {
    text.add_int(number, 2);
    text.add("|");
  }
  EXPECT_EQ(text.view(), " 0| 9|10|999|-1|-10|");
}

TEST(zxtext, hexadecimal_has_exactly_the_digits_asked_for) {
  const struct {
    std::uint64_t number;
    std::size_t digits;
    bool upper;
    const char* text;
  } rows[] = {
      {0, 8, true, "00000000"},
      {0x1234, 8, false, "00001234"},
      {0xBADC0DE, 8, true, "0BADC0DE"},
      {0xBADC0DE, 8, false, "0badc0de"},
      {0x123456789ABCDEF0, 16, true, "123456789ABCDEF0"},
      {0x123456789ABCDEF0, 8, true, "9ABCDEF0"},
      {UINT64_MAX, 16, false, "ffffffffffffffff"},
      {UINT64_MAX, 99, false, "ffffffffffffffff"},
      {7, 0, true, ""},
  };
  for (const auto& row : rows) {
    char room[32];
    zxText text(room);
    text.add_hex(row.number, row.digits, row.upper);
    EXPECT_EQ(text.view(), row.text);
  }
}

TEST(zxtext, an_address_has_all_its_digits_in_upper_case) {
  char room[32];
  zxText text(room);
  text.add_address(0xAB);
  EXPECT_EQ(text.view(), sizeof(void*) == 8 ? "00000000000000AB" : "000000AB");
}

}  // namespace
