// hvldec_test.cpp - tests of hvl/hvldec.h (hvldec.cpp): the compact decimal,
// its decoding, its encoding and its text.
#include "hvldec.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <climits>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "kit/failure.h"
#include "zxsfmt.h"

namespace {

constexpr double k_infinity = std::numeric_limits<double>::infinity();

HvlDecimal of_word(std::int32_t word) { return HvlDecimal::from_word(word); }

std::int32_t word_of(double value) {
  HvlDecimal number;
  number.set_double(value);
  return number.word();
}

// The word of a form: the scaled value above its low bits.
constexpr std::int32_t integer(std::int32_t n) { return n * 2; }
constexpr std::int32_t hundredths(std::int32_t n) { return n * 4 + 3; }
constexpr std::int32_t ten_thousandths(std::int32_t n) { return n * 16 + 1; }
constexpr std::int32_t millionths(std::int32_t n) { return n * 16 + 5; }
constexpr std::int32_t hundred_millionths(std::int32_t n) { return n * 16 + 9; }
constexpr std::int32_t thousands(std::int32_t n) { return n * 16 + 13; }

constexpr double above(double value) {
  return std::nextafter(value, k_infinity);
}
constexpr double below(double value) {
  return std::nextafter(value, -k_infinity);
}

// ---- decoding

struct Decoding {
  std::int32_t word;
  double value;
};

TEST(hvldec, words_decode_by_their_low_bits) {
  constexpr Decoding k_rows[] = {
      {0, 0},
      {2, 1},
      {-2, -1},
      {INT32_MIN, -1073741824.0},
      {INT32_MAX - 1, 1073741823.0},
      {7, 0.01},
      {-1, -0.01},
      {203, 0.5},
      {-197, -0.5},
      {5003, 12.5},
      {INT32_MAX, 5368709.11},
      {INT32_MIN + 3, -5368709.12},
      {403, 0.015625},
      {-397, -0.015625},
      {38403, 1.5},
      {-38397, -1.5},
      {17, 0.0001},
      {-15, -0.0001},
      {160001, 1},
      {21, 0.000001},
      {-11, -0.000001},
      {25, 0.00000001},
      {-7, -0.00000001},
      {29, 1000},
      {-3, -1000},
      {1599999997, 99999999000.0},
      {INT32_MAX - 2, 134217727000.0},
      {INT32_MIN + 13, -134217728000.0},
  };
  for (const Decoding& row : k_rows) {
    SCOPED_TRACE(row.word);
    EXPECT_DOUBLE_EQ(of_word(row.word).to_double(), row.value);
    EXPECT_EQ(of_word(row.word).word(), row.word);
  }
}

TEST(hvldec, a_scaled_value_of_zero_is_zero_in_every_form) {
  for (const std::int32_t word : {0, 1, 3, 5, 9, 13}) {
    SCOPED_TRACE(word);
    EXPECT_EQ(of_word(word).to_double(), 0);
    EXPECT_FALSE(std::signbit(of_word(word).to_double()));
  }
}

TEST(hvldec, a_new_number_is_zero) { EXPECT_EQ(HvlDecimal().word(), 0); }

TEST(hvldec, numbers_are_equal_if_their_words_are) {
  EXPECT_TRUE(of_word(2) == of_word(2));
  EXPECT_FALSE(of_word(2) == of_word(160001));
}

TEST(hvldec, a_number_lies_in_memory_with_its_lowest_byte_first) {
  const HvlDecimal number = of_word(0x12345678);
  EXPECT_EQ(std::memcmp(&number, "\x78\x56\x34\x12", 4), 0);
}

// The factors are multiplied in the order of the table, each product rounded.
TEST(hvldec, decoding_rounds_like_the_products_of_doubles) {
  EXPECT_EQ(of_word(hundredths(29)).to_double(), 29 * 0.01);
  EXPECT_EQ(of_word(hundredths(700)).to_double(), 700 * 0.01 * 0.015625);
  EXPECT_EQ(of_word(ten_thousandths(3)).to_double(), 3 * 0.0001);
  EXPECT_EQ(of_word(millionths(7)).to_double(), 7 * 0.000001);
  EXPECT_EQ(of_word(hundred_millionths(7)).to_double(), 7 * 0.00000001);
}

// ---- encoding

struct Encoding {
  double value;
  std::int32_t word;
};

TEST(hvldec, a_value_takes_the_coarsest_form_that_holds_it) {
  constexpr Encoding k_rows[] = {
      {0, 0},
      {1, 2},
      {2000000, 4000000},
      {4999999, integer(4999999)},
      {0.5, 203},
      {1.5, 603},
      {200.25, 80103},
      {0.01, hundredths(1)},
      {2000000.5, hundredths(200000050)},
      {12.3456, ten_thousandths(123456)},
      {0.0001, ten_thousandths(1)},
      {0.125, ten_thousandths(1250)},
      {0.123456, millionths(123456)},
      {0.000001, millionths(1)},
      {0.12345678, hundred_millionths(12345678)},
      {0.00000001, hundred_millionths(1)},
      {123456789012.0, thousands(99999999)},
      {1234567000.0, thousands(1234567)},
  };
  for (const Encoding& row : k_rows) {
    SCOPED_TRACE(row.value);
    EXPECT_EQ(word_of(row.value), row.word);
  }
  EXPECT_EQ(word_of(-0.0), 0);
  EXPECT_EQ(word_of(-0.5), hundredths(-50));
  EXPECT_EQ(word_of(-0.12345678), hundred_millionths(-12345678));
  EXPECT_EQ(word_of(-0.123456), millionths(-123456));
  EXPECT_EQ(word_of(-12.3456), ten_thousandths(-123456));
  EXPECT_EQ(word_of(-1234567000.0), thousands(-1234567));
}

// A value, the form it takes, and that of its negative.
struct Limit {
  double value;
  std::int32_t word;
  std::int32_t negative_word;
};

void expect_limits(const std::vector<Limit>& rows) {
  for (const Limit& row : rows) {
    SCOPED_TRACE(std::to_string(row.value));
    EXPECT_EQ(word_of(row.value), row.word);
    EXPECT_EQ(word_of(-row.value), row.negative_word);
  }
}

TEST(hvldec, eight_places_end_below_1_34) {
  expect_limits({
      {1.33999999, hundred_millionths(133999999),
       hundred_millionths(-133999999)},
      {below(1.34), hundredths(134), hundredths(-134)},
      {1.34, hundredths(134), hundredths(-134)},
      {above(1.34), hundredths(134), hundredths(-134)},
      {1.34000001, hundredths(134), hundredths(-134)},
      {1.34000101, millionths(1340001), millionths(-1340001)},
      {1.340001, millionths(1340001), millionths(-1340001)},
  });
}

TEST(hvldec, six_places_end_below_134) {
  expect_limits({
      {133.999999, millionths(133999999), millionths(-133999999)},
      {below(134), integer(134), integer(-134)},
      {134, integer(134), integer(-134)},
      {above(134), integer(134), integer(-134)},
      {134.000001, integer(134), integer(-134)},
      {134.0001, ten_thousandths(1340001), ten_thousandths(-1340001)},
  });
}

TEST(hvldec, four_places_end_at_13420) {
  expect_limits({
      {13419.9999, ten_thousandths(134199999), ten_thousandths(-134199999)},
      {below(13420), integer(13420), integer(-13420)},
      {13420, integer(13420), integer(-13420)},
      {above(13420), integer(13420), integer(-13420)},
      {13420.0001, integer(13420), integer(-13420)},
      {13420.01, hundredths(1342001), hundredths(-1342001)},
      {13421.7728, hundredths(1342177), hundredths(-1342177)},
  });
}

TEST(hvldec, two_places_end_below_5000000) {
  expect_limits({
      {4999999.99, hundredths(499999999), hundredths(-499999999)},
      {below(5000000), integer(5000000), integer(-5000000)},
      {5000000, integer(5000000), integer(-5000000)},
      {above(5000000), integer(5000000), integer(-5000000)},
      {5000000.01, integer(5000000), integer(-5000000)},
      {5000000.4, integer(5000000), integer(-5000000)},
      {5000000.5, integer(5000001), integer(-5000001)},
  });
}

TEST(hvldec, whole_numbers_end_at_a_thousand_million) {
  expect_limits({
      {999999999, integer(999999999), integer(-999999999)},
      {999999999.4, integer(999999999), integer(-999999999)},
      {999999999.5, integer(1000000000), integer(-1000000000)},
      {1000000000, integer(1000000000), integer(-1000000000)},
      {above(1e9), thousands(1000000), thousands(-1000000)},
      {1000000000.5, thousands(1000000), thousands(-1000000)},
      {1000001000, thousands(1000001), thousands(-1000001)},
  });
}

TEST(hvldec, thousands_end_at_a_hundred_thousand_million) {
  expect_limits({
      {99999999000.0, thousands(99999999), thousands(-99999999)},
      {99999999499.0, thousands(99999999), thousands(-99999999)},
      {99999999501.0, thousands(100000000), thousands(-100000000)},
      {below(1e11), thousands(100000000), thousands(-100000000)},
      {1e11, thousands(99999999), thousands(-99999999)},
      {above(1e11), thousands(99999999), thousands(-99999999)},
      {1e300, thousands(99999999), thousands(-99999999)},
      {std::numeric_limits<double>::max(), thousands(99999999),
       thousands(-99999999)},
      {k_infinity, thousands(99999999), thousands(-99999999)},
  });
}

// Binary fractions, whose scaled value is a half exactly.
TEST(hvldec, halves_go_away_from_zero) {
  expect_limits({
      {0.001953125, hundred_millionths(195313), hundred_millionths(-195313)},
      {2.0078125, millionths(2007813), millionths(-2007813)},
      {200.03125, ten_thousandths(2000313), ten_thousandths(-2000313)},
      {13420.125, hundredths(1342013), hundredths(-1342013)},
      {6000000.5, integer(6000001), integer(-6000001)},
  });
}

TEST(hvldec, what_is_too_small_to_hold_is_zero) {
  for (const double value : {5e-324, 1e-300, 1e-12, 4.9e-9}) {
    SCOPED_TRACE(value);
    EXPECT_EQ(word_of(value), 0);
    EXPECT_EQ(word_of(-value), 0);
  }
  EXPECT_EQ(word_of(6e-9), hundred_millionths(1));
  EXPECT_EQ(word_of(-6e-9), hundred_millionths(-1));
}

TEST(hvldec, no_number_becomes_zero) {
  HvlDecimal number = of_word(7);
  number.set_double(std::numeric_limits<double>::quiet_NaN());
  EXPECT_EQ(number.word(), 0);
  number = of_word(7);
  number.set_double(-std::numeric_limits<double>::quiet_NaN());
  EXPECT_EQ(number.word(), 0);
}

// The rule once more, step by step; wide integers, so that a step that must
// not overflow shows it.
std::int64_t model_word(double d) {
  const double half = d < 0 ? -0.5 : 0.5;
  const double a = d < 0 ? -d : d;
  const auto scaled = [&](double scale) {
    return static_cast<std::int64_t>(d * scale + half);
  };
  if (a >= 5000000) {
    if (!(a > 1000000000)) return scaled(1) * 2;
    if (a >= 100000000000) d = d < 0 ? -99999999000.0 : 99999999000.0;
    return scaled(0.001) * 16 + 13;
  }
  if (static_cast<double>(static_cast<std::int64_t>(d)) == d)
    return static_cast<std::int64_t>(d) * 2;
  if (a < 1.34 && scaled(100000000) % 100 != 0)
    return scaled(100000000) * 16 + 9;
  if (a < 134 && scaled(1000000) % 100 != 0) return scaled(1000000) * 16 + 5;
  if (a <= 13420 && scaled(10000) % 100 != 0) return scaled(10000) * 16 + 1;
  if (scaled(100) % 100 != 0) return scaled(100) * 4 + 3;
  return scaled(100) / 100 * 2;
}

bool agrees_with_model(double value) {
  const std::int64_t expected = model_word(value);
  if (word_of(value) == expected) return true;
  ADD_FAILURE() << "value " << std::to_string(value) << " gives "
                << word_of(value) << " instead of " << expected;
  return false;
}

// The numbers of one kind of interest, by a random source.
double random_value(std::mt19937_64& random) {
  const auto unit = [&] { return std::ldexp(random() >> 11, -53); };
  const double sign = random() % 2 == 0 ? 1 : -1;
  switch (random() % 4) {
    case 0:  // any size
      return sign * std::exp(unit() * 55 - 25);
    case 1:  // few decimal places
      return sign * std::round(unit() * 1e6) /
             std::pow(10.0, static_cast<double>(random() % 9));
    case 2: {  // near a limit
      constexpr double k_limits[] = {1.34, 134, 13420, 5e6, 1e9, 1e11};
      return sign * k_limits[random() % 6] * (1 + (unit() - 0.5) * 1e-9);
    }
    default:  // halves of the last digit
      return sign * (std::round(unit() * 1e8) + 0.5) /
             std::pow(10.0, static_cast<double>(random() % 10));
  }
}

TEST(hvldec, random_values_encode_as_the_model_does) {
  std::mt19937_64 random(1);
  for (int i = 0; i < 2'000'000; ++i)
    if (!agrees_with_model(random_value(random))) return;
}

// The neighbours of each limit, as near as doubles lie.
TEST(hvldec, the_neighbours_of_the_limits_encode_as_the_model_does) {
  for (const double limit : {1.34, 134.0, 13420.0, 5e6, 1e9, 1e11}) {
    double up = limit;
    double down = limit;
    for (int i = 0; i < 1000; ++i, up = above(up), down = below(down))
      for (const double value : {up, down, -up, -down})
        if (!agrees_with_model(value)) return;
  }
}

// ---- round trips

// Words that are the coarsest form of what they hold.
bool is_coarsest(std::int32_t word) {
  const std::int64_t four_bit = std::llabs(std::int64_t{word >> 4});
  switch (word & 15) {
    case 1:
      return (word >> 4) % 100 != 0 && four_bit < 134200000;
    case 5:
      return (word >> 4) % 100 != 0 && four_bit < 134000000;
    case 9:
      return (word >> 4) % 100 != 0 && four_bit < 134000000;
    case 13:
      return four_bit > 1000000 && four_bit < 100000000;
    case 3:
    case 7:
    case 11:
    case 15:
      return (word >> 2) % 100 != 0 && std::llabs(word >> 2) < 500000000;
    default:
      return std::llabs(word >> 1) <= 1000000000;
  }
}

TEST(hvldec, the_coarsest_words_come_back_from_their_value) {
  std::mt19937 random(2);
  int tried = 0;
  for (int i = 0; i < 2'000'000; ++i) {
    const auto word = static_cast<std::int32_t>(random()) >> random() % 24;
    if (!is_coarsest(word)) continue;
    ++tried;
    ASSERT_EQ(word_of(of_word(word).to_double()), word);
  }
  EXPECT_GT(tried, 1'000'000);
}

TEST(hvldec, a_value_that_was_stored_once_is_stored_alike_again) {
  std::mt19937_64 random(3);
  for (int i = 0; i < 1'000'000; ++i) {
    const double value = random_value(random);
    if (std::fabs(value) >= 99999999000.0) continue;
    const double once = of_word(word_of(value)).to_double();
    const double twice = of_word(word_of(once)).to_double();
    ASSERT_EQ(once, twice) << std::to_string(value);
  }
}

// ---- sixty-fourths

struct Parts {
  std::int32_t whole;
  std::int32_t f;
  std::int32_t word;
};

TEST(hvldec, sixty_fourths_are_stored_as_a_multiple_of_100) {
  constexpr Parts k_rows[] = {
      {0, 0, 3},
      {0, 1, 403},
      {0, -1, -397},
      {0, 63, 25203},
      {1, 0, 25603},
      {-1, 0, -25597},
      {1, 32, 38403},
      {-1, -32, -38397},
      {79999, 63, 2047999603},
      {-79999, -63, -2047999597},
  };
  for (const Parts& row : k_rows) {
    SCOPED_TRACE(row.word);
    HvlDecimal number;
    number.set_sixty_fourths(row.whole, row.f);
    EXPECT_EQ(number.word(), row.word);
    EXPECT_TRUE(number.is_sixty_fourths());
    std::int32_t whole = 99;
    std::int32_t f = 99;
    EXPECT_TRUE(number.get_sixty_fourths(whole, f));
    EXPECT_EQ(whole, row.whole);
    EXPECT_EQ(f, row.f);
  }
}

TEST(hvldec, all_sixty_fourths_come_back) {
  for (std::int32_t n = -300 * 64; n <= 300 * 64; ++n) {
    HvlDecimal number;
    number.set_sixty_fourths(n / 64, n % 64);
    std::int32_t whole = 99;
    std::int32_t f = 99;
    ASSERT_TRUE(number.get_sixty_fourths(whole, f));
    ASSERT_EQ(whole, n / 64);
    ASSERT_EQ(f, n % 64);
    ASSERT_DOUBLE_EQ(number.to_double(), n / 64.0);
  }
}

TEST(hvldec, sixty_fourths_of_80000_and_more_are_stored_as_values) {
  constexpr Parts k_rows[] = {
      {80000, 0, integer(80000)},
      {-80000, 0, integer(-80000)},
      {80000, 1, hundredths(8000002)},
      {-80000, -63, hundredths(-8000098)},
      {5000000, 32, integer(5000001)},
      {INT32_MAX, 63, thousands(2147484)},
      {INT32_MIN, 0, thousands(-2147484)},
      {INT32_MIN, -63, thousands(-2147484)},
  };
  for (const Parts& row : k_rows) {
    SCOPED_TRACE(row.whole);
    HvlDecimal number;
    number.set_sixty_fourths(row.whole, row.f);
    EXPECT_EQ(number.word(), row.word);
  }
}

constexpr Parts k_bad_parts[] = {
    {0, 64, 0},     {0, -64, 0},       {5, -1, 0},         {-5, 1, 0},
    {1, -63, 0},    {-1, 63, 0},       {0, INT32_MAX, 0},  {0, INT32_MIN, 0},
    {80000, -1, 0}, {INT32_MIN, 1, 0}, {INT32_MAX, -1, 0}, {1, 1000, 0},
};

TEST(hvldec, sixty_fourths_must_be_parts_of_one_sign) {
  for (const Parts& row : k_bad_parts) {
    SCOPED_TRACE(std::to_string(row.whole) + " and " + std::to_string(row.f));
    HvlDecimal number = of_word(7);
    EXPECT_ASSERTION(number.set_sixty_fourths(row.whole, row.f), "hvldec");
    EXPECT_EQ(number.word(), 7);
  }
}

TEST(hvldec, a_dropped_assertion_leaves_the_number) {
  kit::with_failures_dropped([] {
    HvlDecimal number = of_word(7);
    for (const Parts& row : k_bad_parts)
      number.set_sixty_fourths(row.whole, row.f);
    number.set_small_int(10000);
    number.set_small_int(INT32_MIN);
    EXPECT_EQ(number.word(), 7);
  });
}

TEST(hvldec, other_forms_have_no_sixty_fourths) {
  for (const std::int32_t word : {0, 2, 7, 203, 1, 5, 9, 13, 160001, -1}) {
    SCOPED_TRACE(word);
    std::int32_t whole = 99;
    std::int32_t f = 99;
    EXPECT_FALSE(of_word(word).is_sixty_fourths());
    EXPECT_FALSE(of_word(word).get_sixty_fourths(whole, f));
    EXPECT_EQ(whole, 99);
    EXPECT_EQ(f, 99);
  }
}

// ---- small whole numbers

TEST(hvldec, small_ints_are_ten_thousandths) {
  for (std::int32_t n = -9999; n <= 9999; ++n) {
    HvlDecimal number;
    number.set_small_int(n);
    ASSERT_EQ(number.word(), n * 160000 + 1);
    ASSERT_TRUE(number.is_small_int());
    // Codes are compared as doubles.
    ASSERT_EQ(number.to_double(), n);
  }
}

TEST(hvldec, small_ints_have_four_digits) {
  HvlDecimal number = of_word(7);
  for (const std::int32_t n : {10000, -10000, INT32_MAX, INT32_MIN}) {
    SCOPED_TRACE(n);
    EXPECT_ASSERTION(number.set_small_int(n), "hvldec");
    EXPECT_EQ(number.word(), 7);
  }
}

TEST(hvldec, a_small_int_is_told_by_its_form) {
  for (const std::int32_t word : {1, 160001, -159999, 1599840001}) {
    SCOPED_TRACE(word);
    EXPECT_TRUE(of_word(word).is_small_int());
  }
  for (const std::int32_t word : {0, 2, 3, 5, 9, 13, 17, -15, 160003, 160005,
                                  160009, 160013, 160017, 159985}) {
    SCOPED_TRACE(word);
    EXPECT_FALSE(of_word(word).is_small_int());
  }
}

// ---- text

struct Text {
  std::int32_t word;
  const char* text;
};

std::string text_of(std::int32_t word) {
  char text[HvlDecimal::k_max_text];
  return {text, of_word(word).write_text(text)};
}

TEST(hvldec, numbers_have_a_text) {
  constexpr Text k_rows[] = {
      {0, "0"},
      {1, "0"},
      {3, "0"},
      {5, "0"},
      {9, "0"},
      {13, "0"},
      {2, "1"},
      {-2, "-1"},
      {INT32_MIN, "-1073741824"},
      {INT32_MAX - 1, "1073741823"},
      {7, "0.01"},
      {-1, "-0.01"},
      {203, "0.5"},
      {5003, "12.5"},
      {43, "0.1"},
      {INT32_MAX, "5368709.11"},
      {403, "0.015625"},
      {-397, "-0.015625"},
      {25203, "0.984375"},
      {25603, "1"},
      {2047999603, "79999.984375"},
      {17, "0.0001"},
      {-15, "-0.0001"},
      {160001, "1"},
      {ten_thousandths(123450), "12.345"},
      {ten_thousandths(134217727), "13421.7727"},
      {millionths(1), "1e-006"},
      {millionths(-1), "-1e-006"},
      {millionths(12), "1.2e-005"},
      {millionths(99), "9.9e-005"},
      {millionths(100), "0.0001"},
      {millionths(134217727), "134.217727"},
      {hundred_millionths(1), "1e-008"},
      {hundred_millionths(10), "1e-007"},
      {hundred_millionths(-1234), "-1.234e-005"},
      {hundred_millionths(9999), "9.999e-005"},
      {hundred_millionths(10000), "0.0001"},
      {hundred_millionths(10001), "0.00010001"},
      {hundred_millionths(134217727), "1.34217727"},
      {hundred_millionths(-134217728), "-1.34217728"},
      {29, "1000"},
      {-3, "-1000"},
      {thousands(99999999), "99999999000"},
      {thousands(134217727), "134217727000"},
      {thousands(-134217728), "-134217728000"},
  };
  for (const Text& row : k_rows) {
    SCOPED_TRACE(row.word);
    EXPECT_EQ(text_of(row.word), row.text);
  }
}

// The two roads from words to text, for one thread: the word's digits, and
// the double.
class Roads {
 public:
  Roads() {
    by_double.reserve(64);
    text[HvlDecimal::k_max_text] = k_guard;
  }

  bool agree(std::int32_t word) {
    const HvlDecimal number = of_word(word);
    const char* end = number.write_text(text);
    by_double.set_length(0);
    append_number(by_double, number.to_double());
    const std::string_view written(text, static_cast<std::size_t>(end - text));
    return written == by_double.view() &&
           text[HvlDecimal::k_max_text] == k_guard;
  }

 private:
  static constexpr char k_guard = '?';
  char text[HvlDecimal::k_max_text + 1];
  zxStr by_double;
};

bool expect_agreement(Roads& roads, std::int32_t word) {
  if (roads.agree(word)) return true;
  zxStr other;
  append_number(other, of_word(word).to_double());
  ADD_FAILURE() << "word " << word << " is '" << text_of(word)
                << "' by its digits, '" << other.view() << "' by its double";
  return false;
}

// Each form with scaled values around zero, the powers of ten, the powers of
// two and the ends of its range.
std::vector<std::int32_t> corners() {
  std::vector<std::int64_t> centres = {
      0, 1340000, 13420, 134000000, 134200000, 500000000, 1000000000};
  for (std::int64_t p = 1; p <= 1'000'000'000; p *= 10) centres.push_back(p);
  for (std::int64_t p = 1; p <= INT64_C(1) << 31; p *= 2) centres.push_back(p);
  std::vector<std::int32_t> words;
  for (const std::int64_t centre : centres)
    for (const std::int64_t sign : {1, -1})
      for (std::int64_t step = -130; step <= 130; ++step)
        for (const auto& [bits, low] :
             {std::pair(1, 0), {2, 3}, {4, 1}, {4, 5}, {4, 9}, {4, 13}}) {
          const std::int64_t word =
              (sign * centre + step) * (INT64_C(1) << bits) + low;
          if (word >= INT32_MIN && word <= INT32_MAX)
            words.push_back(static_cast<std::int32_t>(word));
        }
  return words;
}

TEST(hvldec, the_text_is_that_of_the_double_at_all_corners) {
  Roads roads;
  const std::vector<std::int32_t> words = corners();
  EXPECT_GT(words.size(), 50'000U);
  for (const std::int32_t word : words)
    if (!expect_agreement(roads, word)) return;
}

TEST(hvldec, the_text_is_that_of_the_double_for_random_words) {
  Roads roads;
  std::mt19937 random(4);
  for (int i = 0; i < 2'000'000; ++i) {
    // Small ones as often as large ones.
    const auto word = static_cast<std::int32_t>(random()) >> random() % 28;
    if (!expect_agreement(roads, word)) return;
  }
}

// "%.15g" of the run-time library, its exponent widened.
std::string printed(double value) {
  char text[64];
  std::snprintf(text, sizeof text, "%.15g", value);
  std::string result = text;
  const std::size_t e = result.find('e');
  if (e != result.npos && result.size() - e == 4) result.insert(e + 2, "0");
  return result;
}

TEST(hvldec, the_text_is_what_the_run_time_library_prints) {
  for (const std::int32_t word : corners())
    ASSERT_EQ(text_of(word), printed(of_word(word).to_double())) << word;
  std::mt19937 random(5);
  for (int i = 0; i < 200'000; ++i) {
    const auto word = static_cast<std::int32_t>(random()) >> random() % 28;
    ASSERT_EQ(text_of(word), printed(of_word(word).to_double())) << word;
  }
}

// ---- the same on both targets

// 64-bit FNV-1a over numbers, the lowest byte first.
class Checksum {
 public:
  void add(std::uint64_t number, int bytes) {
    for (int i = 0; i < bytes; ++i, number >>= 8)
      sum = (sum ^ (number & 255)) * 0x100000001B3U;
  }
  std::uint64_t value() const { return sum; }

 private:
  std::uint64_t sum = 0xCBF29CE484222325U;
};

// Words of all sizes.
class Words {
 public:
  std::int32_t next() {
    state = state * 6364136223846793005U + 1442695040888963407U;
    const auto word = static_cast<std::int32_t>(state >> 32);
    return word >> (state >> 27 & 31);
  }

 private:
  std::uint64_t state = 1;
};

// The two sums are those of the following program, whose numbers are doubles:
//
//   import struct
//   F = (0.0001, 0.000001, 0.00000001, 1000.0)
//   def words():
//       s = 1
//       for _ in range(1000000):
//           s = (s * 6364136223846793005 + 1442695040888963407) % 2**64
//           yield ((s >> 32 ^ 2**31) - 2**31) >> (s >> 27 & 31)
//   def double(w):
//       if w & 1 == 0: return float(w >> 1)
//       if w & 3 != 3: return float(w >> 4) * F[w >> 2 & 3]
//       v = float(w >> 2) * 0.01
//       return v if (w >> 2) % 100 else v * 0.015625
//   def word(d):
//       a = abs(d)
//       def by(f): return int(d * f + (-0.5 if d < 0 else 0.5))
//       if a > 1e9:
//           if a >= 1e11: d = -99999999000.0 if d < 0 else 99999999000.0
//           return by(0.001) * 16 + 13
//       if a >= 5e6: return by(1.0) * 2
//       if int(d) == d: return int(d) * 2
//       if a < 1.34 and by(1e8) % 100: return by(1e8) * 16 + 9
//       if a < 134 and by(1e6) % 100: return by(1e6) * 16 + 5
//       if a <= 13420 and by(1e4) % 100: return by(1e4) * 16 + 1
//       h = by(100.0)
//       return h * 4 + 3 if h % 100 else int(h / 100) * 2
//   def fnv(blocks):
//       h = 0xCBF29CE484222325
//       for block in blocks:
//           for b in block: h = (h ^ b) * 0x100000001B3 % 2**64
//       return h
//   print(hex(fnv(struct.pack("<d", double(w)) for w in words())))
//   print(hex(fnv(struct.pack("<i", word(double(w) / 7)) for w in words())))
constexpr std::uint64_t k_sum_of_doubles = 0xA37389DDE459ACD4;
constexpr std::uint64_t k_sum_of_words = 0x9B9723C92D87AB8A;

TEST(hvldec, a_million_words_decode_to_the_same_bits_everywhere) {
  Words words;
  Checksum sum;
  for (int i = 0; i < 1'000'000; ++i)
    sum.add(std::bit_cast<std::uint64_t>(of_word(words.next()).to_double()), 8);
  EXPECT_EQ(sum.value(), k_sum_of_doubles);
}

TEST(hvldec, a_million_values_encode_to_the_same_word_everywhere) {
  Words words;
  Checksum sum;
  for (int i = 0; i < 1'000'000; ++i) {
    const double value = of_word(words.next()).to_double() / 7;
    sum.add(static_cast<std::uint32_t>(word_of(value)), 4);
  }
  EXPECT_EQ(sum.value(), k_sum_of_words);
}

// ---- all words

// One part of all words; the first that differs, or none.
struct Part {
  std::uint32_t first;
  std::uint32_t count;
  bool differs = false;
  std::int32_t word = 0;

  void run() {
    Roads roads;
    for (std::uint32_t i = 0; i < count; ++i) {
      word = static_cast<std::int32_t>(first + i);
      differs = !roads.agree(word);
      if (differs) return;
    }
  }
};

TEST(hvldec_slow, the_text_is_that_of_the_double_for_all_words) {
  const unsigned threads = std::max(1U, std::thread::hardware_concurrency());
  constexpr std::uint32_t k_part = 1U << 24;
  for (std::uint64_t start = 0; start < std::uint64_t{1} << 32;) {
    std::vector<Part> parts;
    for (unsigned i = 0; i < threads && start < std::uint64_t{1} << 32; ++i) {
      parts.push_back({static_cast<std::uint32_t>(start), k_part});
      start += k_part;
    }
    std::vector<std::thread> running;
    for (Part& part : parts) running.emplace_back(&Part::run, &part);
    for (std::thread& thread : running) thread.join();
    Roads roads;
    for (const Part& part : parts)
      if (part.differs) {
        expect_agreement(roads, part.word);
        return;
      }
  }
}

}  // namespace
