// zxstr2_number_test.cpp - tests of the numbers of zxlib/zxstr2.h, which
// zxstr2_number.cpp reads: rows, slow models, and the digits that decide the
// rounding of a double.

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <random>
#include <string>
#include <string_view>

#include "kit/failure.h"
#include "kit/text.h"
#include "regex_run.h"
#include "zxstr2.h"

namespace {

using namespace std::string_literals;
using namespace std::string_view_literals;

constexpr std::string_view k_digits = "0123456789";

bool is_digit(char byte) {
  return k_digits.find(byte) != std::string_view::npos;
}

std::string stripped(std::string_view text) {
  constexpr std::string_view k_space = " \t\n\v\f\r";
  const std::size_t first = text.find_first_not_of(k_space);
  if (first == std::string_view::npos) return "";
  return std::string(
      text.substr(first, text.find_last_not_of(k_space) + 1 - first));
}

// ---------------------------------------------------------- whole numbers --

// The rules told with numbers of 64 bits that are cut down to 32.
std::int32_t slow_parse_long(std::string_view given) {
  std::string text = stripped(given);
  if (text.empty()) return 0;
  const char sign = text[0];
  if (sign == '-' || sign == '+') text.erase(0, 1);
  std::int64_t value = 0;  // of 0 to 2^32 - 1
  for (std::size_t i = 0; i < text.size(); ++i) {
    const bool is_last = i + 1 == text.size();
    const bool digit_follows = !is_last && is_digit(text[i + 1]);
    if (is_digit(text[i])) {
      value = (value * 10 + (text[i] - '0')) % 0x100000000;
      if (value >= 0x80000000) return 0;
    } else if (text[i] == ',' && value != 0 && digit_follows) {
      continue;
    } else if (is_last &&
               (text[i] == 'k' || (text[i] == 'K' && value < 2147483))) {
      value = value * 1000 % 0x100000000;
    } else if (is_last &&
               (text[i] == 'm' || (text[i] == 'M' && value < 2147))) {
      value = value * 1000000 % 0x100000000;
    } else {
      return 0;
    }
  }
  if (sign == '-') value = (0x100000000 - value) % 0x100000000;
  return static_cast<std::int32_t>(value < 0x80000000 ? value
                                                      : value - 0x100000000);
}

void expect_long_of_model(const std::string& text) {
  ASSERT_EQ(parse_long(text.c_str()), slow_parse_long(text)) << text;
}

TEST(zxstr2_number, parse_long_reads_whole_numbers) {
  const struct {
    std::string_view text;
    std::int32_t value;
  } rows[] = {
      {"0", 0},
      {"7", 7},
      {"007", 7},
      {"1234", 1234},
      {"2147483647", INT32_MAX},
      {"-2147483647", -INT32_MAX},
      {"00000000000000000002147483647", INT32_MAX},
      // White space at both ends.
      {"", 0},
      {" ", 0},
      {" \t\n\v\f\r", 0},
      {"\t\n\v\f\r 12\t\n\v\f\r ", 12},
      {"1 2", 0},
      {"\xA0"
       "12",
       0},
      {"12\0"sv, 0},
      {"\0"sv, 0},
      // One sign, with nothing between it and the digits.
      {"+5", 5},
      {"-5", -5},
      {"-0", 0},
      {"-", 0},
      {"+", 0},
      {"--5", 0},
      {"+-5", 0},
      {"- 5", 0},
      {"5-", 0},
      // Commas, once the number is above 0, with a digit behind.
      {"12,345", 12345},
      {"1,2,3,4", 1234},
      {"12,", 0},
      {",12", 0},
      {"1,,2", 0},
      {"0,5", 0},
      {"00,5", 0},
      {"10,05", 1005},
      {"-,5", 0},
      {"1,k", 0},
      {"1,000k", 1000000},
      {"1, ", 0},
      {"1,-2", 0},
      // Suffixes, as the last character.
      {"  12,345k ", 12345000},
      {"2k", 2000},
      {"2K", 2000},
      {"3m", 3000000},
      {"3M", 3000000},
      {"-5m", -5000000},
      {"k", 0},
      {"M", 0},
      {"-k", 0},
      {"1kk", 0},
      {"1km", 0},
      {"k1", 0},
      {"1 k", 0},
      {"5g", 0},
      {"5x", 0},
      {"1.5", 0},
      {"1e5", 0},
      {"0x10", 0},
      // The upper-case ones are refused where the number would not fit.
      {"2147482K", 2147482000},
      {"2147483K", 0},
      {"-2147482K", -2147482000},
      {"2146M", 2146000000},
      {"2147M", 0},
      // The lower-case ones wrap.
      {"2147483k", 2147483000},
      {"2147484k", -2147483296},
      {"-2147484k", 2147483296},
      {"2147m", 2147000000},
      {"2148m", -2146967296},
      {"4295m", 32704},
      {"2147483647k", -1000},
      {"2147483647m", -1000000},
      {"268435456k", INT32_MIN},
      {"-268435456k", INT32_MIN},
      // Digits wrap too, and a number that turns negative on the way is 0.
      {"2147483648", 0},
      {"-2147483648", 0},
      {"4294967295", 0},
      {"4294967296", 0},
      {"4294967297", 1},
      {"42949672961", 1},
      {"99999999999", 1215752191},
      {"-99999999999", -1215752191},
      // Wrapped to 0, a comma is none of the number.
      {"4294967296,5", 0},
      {"42949672965", 5},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(parse_long(row.text), row.value)
        << testing::PrintToString(row.text);
    EXPECT_EQ(slow_parse_long(row.text), row.value)
        << testing::PrintToString(row.text);
  }
}

TEST(zxstr2_number, parse_long_of_short_texts_agrees_with_the_slow_model) {
  kit::for_all_texts("019,.-kMe ", 6, expect_long_of_model);
  kit::for_all_texts("2,+mKk\t", 5, expect_long_of_model);
}

TEST(zxstr2_number_slow,
     parse_long_of_longer_texts_agrees_with_the_slow_model) {
  kit::for_all_texts("019,.-kMe ", 7, expect_long_of_model);
}

TEST(zxstr2_number, parse_long_of_random_digits_wraps_as_the_slow_model) {
  constexpr unsigned k_seed = 1414;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (int round = 0; round < 100000; ++round) {
    std::string text(random() % 2, '-');
    for (std::size_t left = 1 + random() % 24; left > 0; --left) {
      text += k_digits[random() % 10];
      if (random() % 8 == 0) text += ',';
    }
    text += std::string(1, "kmKM"[random() % 4]).substr(0, random() % 2);
    expect_long_of_model(text);
  }
}

TEST(zxstr2_number, parse_hex_reads_hexadecimal_digits) {
  const struct {
    std::string_view text;
    std::uint32_t value;
  } rows[] = {
      {"", 0},
      {"0", 0},
      {"9", 9},
      {"a", 10},
      {"F", 15},
      {"0x1Fh", 31},
      {"1f", 31},
      {"1G", 0},
      {"0123456789", 0x23456789},
      {"abcdef", 0xABCDEF},
      {"ABCDEF", 0xABCDEF},
      {"FFFFFFFF", 0xFFFFFFFF},
      {"80000000", 0x80000000},
      // Digits beyond the eighth push the first ones out.
      {"123456789", 0x23456789},
      {"F00000000", 0},
      // Blanks ahead, and only these.
      {"  1f", 31},
      {" ", 0},
      {"\t1", 0},
      {"1 ", 0},
      {"1 1", 0},
      {" 0x1", 1},
      {"0x 1", 0},
      // One prefix.
      {"0x", 0},
      {"0X2a", 42},
      {"x1", 0},
      {"0x0x1", 0},
      {"00x1", 0},
      // One suffix.
      {"1h", 1},
      {"1H", 1},
      {"h", 0},
      {"hh", 0},
      {"1hh", 0},
      {"1h ", 0},
      {"h1", 0},
      {"0xh", 0},
      {"0xAh", 10},
      // No signs, nothing else.
      {"-1", 0},
      {"+1", 0},
      {"1,000", 0},
      {"1.0", 0},
      {"1\0"sv, 0},
      {"1\xE0", 0},
  };
  for (const auto& row : rows)
    EXPECT_EQ(parse_hex(row.text), row.value)
        << testing::PrintToString(row.text);
}

TEST(zxstr2_number, parse_hex_knows_every_byte) {
  for (int byte = 0; byte < 256; ++byte) {
    const char text[] = {'1', static_cast<char>(byte), '2'};
    const std::size_t lower = "0123456789abcdef"s.find(text[1]);
    const std::size_t upper = "0123456789ABCDEF"s.find(text[1]);
    const std::size_t digit = std::min(lower, upper);
    const std::size_t expected =
        digit == std::string::npos ? 0 : 0x102 + 16 * digit;
    EXPECT_EQ(parse_hex({text, 3}), expected) << byte;
  }
}

TEST(zxstr2_number, parse_hex_gives_back_what_is_printed) {
  for (std::uint64_t value = 1; value <= 0xFFFFFFFF; value = value * 3 + 1) {
    char text[20];
    std::snprintf(text, sizeof text, "%llx",
                  static_cast<unsigned long long>(value));
    EXPECT_EQ(parse_hex(text), value);
    std::snprintf(text, sizeof text, " 0X%llXH",
                  static_cast<unsigned long long>(value));
    EXPECT_EQ(parse_hex(text), value);
  }
}

// ---------------------------------------------------------------- doubles --

// Takes the digits off the front of a text.
std::string take_digits(std::string& text) {
  const std::string digits =
      text.substr(0, std::min(text.find_first_not_of(k_digits), text.size()));
  text.erase(0, digits.size());
  return digits;
}

// The text without what the C library does not know; empty for one that is no
// number.
std::string cleaned(std::string_view given) {
  std::string text = stripped(given);
  std::string clean;
  if (!text.empty() && (text[0] == '-' || text[0] == '+')) {
    clean = text[0];
    text.erase(0, 1);
  }
  std::string digits = take_digits(text);
  while (!digits.empty() && text.size() > 1 && text[0] == ',' &&
         is_digit(text[1])) {
    text.erase(0, 1);
    digits += take_digits(text);
  }
  if (!text.empty() && text[0] == '.') {
    text.erase(0, 1);
    digits += '.' + take_digits(text);
  }
  if (digits.empty() || digits == ".") return "";
  clean += digits;
  if (text.empty()) return clean;
  if (text.size() == 1) {
    const std::size_t suffix = "kKmMgG"s.find(text[0]);
    if (suffix == std::string::npos) return "";
    return clean + "e" + std::to_string(3 * (suffix / 2 + 1));
  }
  if (text[0] != 'e' && text[0] != 'E') return "";
  std::string exponent = text.substr(1);
  const bool has_sign = exponent[0] == '-' || exponent[0] == '+';
  const std::string power = exponent.substr(has_sign ? 1 : 0);
  if (power.empty() || power.find_first_not_of(k_digits) != std::string::npos)
    return "";
  return clean + "e" + exponent;
}

double slow_parse_double(std::string_view given) {
  const std::string clean = cleaned(given);
  return clean.empty() ? 0.0 : std::strtod(clean.c_str(), nullptr);
}

// Bits are compared, so that -0 is not 0.
std::uint64_t bits_of(double value) {
  return std::bit_cast<std::uint64_t>(value);
}

void expect_double(const std::string& text, double value) {
  ASSERT_EQ(bits_of(parse_double(text.c_str())), bits_of(value))
      << text.substr(0, 60) << ", " << text.size() << " bytes, gives "
      << parse_double(text.c_str()) << " in place of " << value;
}

void expect_double_of_model(const std::string& text) {
  expect_double(text, slow_parse_double(text));
}

constexpr double k_infinity = std::numeric_limits<double>::infinity();

TEST(zxstr2_number, parse_double_reads_numbers) {
  const struct {
    std::string_view text;
    double value;
  } rows[] = {
      {"0", 0.0},
      {"-0", -0.0},
      {"-0.0e5", -0.0},
      {"+0", 0.0},
      {"7", 7.0},
      {"007.50", 7.5},
      {"1234567", 1234567.0},
      {"-0.5", -0.5},
      {".5", 0.5},
      {"5.", 5.0},
      {"0.1", 0.1},
      {"3.141592653589793", 3.141592653589793},
      // White space at both ends.
      {"", 0.0},
      {" \t\n\v\f\r", 0.0},
      {"\t\n\v\f\r 1.5\t\n\v\f\r ", 1.5},
      {"1 .5", 0.0},
      {"1. 5", 0.0},
      {"1.5\0"sv, 0.0},
      {"\0"sv, 0.0},
      // One sign, no number without a digit.
      {"+1.5", 1.5},
      {"--1", 0.0},
      {"- 1", 0.0},
      {"-", 0.0},
      {".", 0.0},
      {"-.", 0.0},
      {"+.e5", 0.0},
      {"e5", 0.0},
      {"-e5", 0.0},
      {"k", 0.0},
      {"-k", 0.0},
      {".k", 0.0},
      // Commas between two digits ahead of the point.
      {"1,000.5", 1000.5},
      {"1,2,3.5", 123.5},
      {"0,5", 5.0},
      {"1,", 0.0},
      {",1", 0.0},
      {"1,,2", 0.0},
      {"1,.5", 0.0},
      {"1.5,0", 0.0},
      {"1.,5", 0.0},
      {"1,k", 0.0},
      {"1,000k", 1000000.0},
      {"1,000e3", 1000000.0},
      {"1e1,0", 0.0},
      {"-,1", 0.0},
      // Suffixes.
      {"2k", 2000.0},
      {"2K", 2000.0},
      {"1.5m", 1500000.0},
      {"1.5M", 1500000.0},
      {"1.5g", 1500000000.0},
      {"-1.5G", -1500000000.0},
      {".5k", 500.0},
      {"5.k", 5000.0},
      {"-0k", -0.0},
      {"1x", 0.0},
      {"1-", 0.0},
      {"1kk", 0.0},
      {"1k5", 0.0},
      {"1 k", 0.0},
      {"1e5k", 0.0},
      // Exponents.
      {"1e5", 100000.0},
      {"1E5", 100000.0},
      {"1e+5", 100000.0},
      {"1e-5", 0.00001},
      {"1.e2", 100.0},
      {".1e2", 10.0},
      {"1e005", 100000.0},
      {"1e0", 1.0},
      {"1e", 0.0},
      {"1E", 0.0},
      {"1e+", 0.0},
      {"1e-", 0.0},
      {"1ee5", 0.0},
      {"1e5.", 0.0},
      {"1e5.5", 0.0},
      {"1e+-5", 0.0},
      {"1e 5", 0.0},
      {"1d5", 0.0},
      // Names and other notations.
      {"inf", 0.0},
      {"infinity", 0.0},
      {"nan", 0.0},
      {"0x10", 0.0},
      {"0x1p3", 0.0},
      {"1f", 0.0},
      {"1_000", 0.0},
      {"1'000", 0.0},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(bits_of(parse_double(row.text)), bits_of(row.value))
        << testing::PrintToString(row.text);
    EXPECT_EQ(bits_of(slow_parse_double(row.text)), bits_of(row.value))
        << testing::PrintToString(row.text);
  }
}

TEST(zxstr2_number, parse_double_beyond_the_largest_is_infinity) {
  const std::string nines(400, '9');
  const struct {
    std::string text;
    double value;
  } rows[] = {
      {"1e308", 1e308},
      {"1.7976931348623157e308", 0x1.fffffffffffffp1023},
      // Half-way to the next power of 2, and below it.
      {"1.7976931348623158e308", 0x1.fffffffffffffp1023},
      {"1.7976931348623159e308", k_infinity},
      {"1e309", k_infinity},
      {"-1e309", -k_infinity},
      {"1e400", k_infinity},
      {"1e401", k_infinity},
      {"1e99999999999999999999999999", k_infinity},
      {"-1e99999999999999999999999999", -k_infinity},
      {nines, k_infinity},
      {nines + "e-92", 1e308},
      {nines + "e-91", k_infinity},
      {nines + "e-400", 1.0},
      {"0." + std::string(400, '0') + "1e401", 1.0},
      {"0." + std::string(400, '0') + "1e800", k_infinity},
      {"1" + std::string(400, '0') + "e-400", 1.0},
      {"1" + std::string(400, '0') + "k", k_infinity},
      {"999999" + std::string(300, '0') + "g", k_infinity},
  };
  for (const auto& row : rows) expect_double(row.text, row.value);
}

TEST(zxstr2_number, parse_double_below_the_smallest_is_0) {
  const struct {
    std::string text;
    double value;
  } rows[] = {
      {"2.2250738585072014e-308", 0x1p-1022},
      {"2.2250738585072011e-308", 0x0.fffffffffffffp-1022},
      {"4.9406564584124654e-324", 0x1p-1074},
      {"5e-324", 0x1p-1074},
      {"3e-324", 0x1p-1074},
      {"2.4703282292062328e-324", 0x1p-1074},
      {"2.4703282292062327e-324", 0.0},
      {"2e-324", 0.0},
      {"-2e-324", -0.0},
      {"1e-400", 0.0},
      {"1e-401", 0.0},
      {"-1e-99999999999999999999999999", -0.0},
      {"0e99999999999999999999999999", 0.0},
      {"-0.000e99999999999999999999999999", -0.0},
      {"0." + std::string(500, '0') + "1", 0.0},
      {std::string(500, '0'), 0.0},
  };
  for (const auto& row : rows) expect_double(row.text, row.value);
}

TEST(zxstr2_number,
     parse_double_weighs_exponents_against_any_number_of_digits) {
  constexpr std::size_t k_many = 1000000;
  const std::string zeros(k_many, '0');
  expect_double("1" + zeros + "e-1000000", 1.0);
  expect_double("0." + zeros + "1e1000001", 1.0);
  expect_double("-0." + zeros + "25e1000001", -2.5);
  expect_double(zeros + "1.5", 1.5);
  expect_double("1.5" + zeros, 1.5);
  expect_double("1e" + zeros + "5", 1e5);
  expect_double("1e-" + zeros + "5", 1e-5);
  expect_double("1" + zeros, k_infinity);
  expect_double("0." + zeros + "1", 0.0);
}

// The decimal digits of half a number, exactly; both may have a point.
std::string halved(const std::string& number) {
  std::string half;
  int carry = 0;
  for (const char digit : number) {
    if (digit == '.') {
      half += digit;
      continue;
    }
    const int value = carry * 10 + (digit - '0');
    half += k_digits[static_cast<std::size_t>(value / 2)];
    carry = value % 2;
  }
  if (carry == 0) return half;
  if (half.find('.') == std::string::npos) half += '.';
  return half + "5";
}

// Numbers half-way between two doubles: a tie, which goes to the even one,
// and the smallest differences that end it.
void expect_tie(const std::string& tie, double below, double above) {
  const bool below_is_even = (bits_of(below) & 1) == 0;
  expect_double(tie, below_is_even ? below : above);
  const std::string point = tie.find('.') == std::string::npos ? "." : "";
  for (const std::size_t zeros : {0U, 1U, 10U, 100U, 1000U, 100000U}) {
    expect_double(tie + point + std::string(zeros, '0'),
                  below_is_even ? below : above);
    expect_double(tie + point + std::string(zeros, '0') + "1", above);
  }
  std::string less = tie;
  less.back() = static_cast<char>(less.back() - 1);
  for (const std::size_t nines : {0U, 1U, 10U, 100U, 1000U, 100000U})
    expect_double(less + point + std::string(nines, '9'), below);
}

TEST(zxstr2_number, parse_double_rounds_to_the_nearest_and_ties_to_even) {
  expect_tie("9007199254740993", 0x1p53, 0x1.0000000000001p53);
  expect_tie("9007199254740995", 0x1.0000000000001p53, 0x1.0000000000002p53);
  expect_tie("4503599627370496.5", 0x1p52, 0x1.0000000000001p52);
  expect_tie("4503599627370497.5", 0x1.0000000000001p52, 0x1.0000000000002p52);
  // 1 + 2^-53, of 53 digits; 1 - 2^-54; 2^1024 - 2^970.
  std::string tie = "1";
  for (int i = 0; i < 53; ++i) tie = halved(tie);
  expect_tie("1" + tie.substr(1), 1.0, 0x1.0000000000001p0);
}

TEST(zxstr2_number, parse_double_looks_at_all_digits_that_decide) {
  // Half the smallest double, 2^-1075, and one and a half of it.
  std::string half = "1";
  for (int i = 0; i < 1075; ++i) half = halved(half);
  EXPECT_EQ(half.size(), 1077U);  // "0." and 1075 digits
  expect_tie(half, 0.0, 0x1p-1074);
  std::string one_and_half = "3";
  for (int i = 0; i < 1075; ++i) one_and_half = halved(one_and_half);
  expect_tie(one_and_half, 0x1p-1074, 0x1p-1073);
  // The tie with the most digits, 767: below the smallest normal double by
  // half the smallest one, (2^53 - 1) x 2^-1075.
  std::string longest = "9007199254740991";
  for (int i = 0; i < 1075; ++i) longest = halved(longest);
  expect_tie(longest, 0x0.fffffffffffffp-1022, 0x1p-1022);
}

TEST(zxstr2_number, parse_double_of_short_texts_agrees_with_the_slow_model) {
  kit::for_all_texts("019,.-kMe ", 6, expect_double_of_model);
  kit::for_all_texts("5,.+eEg\t", 5, expect_double_of_model);
}

TEST(zxstr2_number_slow,
     parse_double_of_longer_texts_agrees_with_the_slow_model) {
  kit::for_all_texts("019,.-kMe ", 7, expect_double_of_model);
}

// A random double of any size.
double random_double(std::mt19937_64& random) {
  for (;;) {
    const auto value = std::bit_cast<double>(random());
    if (std::isfinite(value)) return value;
  }
}

void expect_random_doubles_back(int rounds) {
  constexpr unsigned k_seed = 777;
  std::printf("seed %u\n", k_seed);
  std::mt19937_64 random(k_seed);
  constexpr std::chars_format k_formats[] = {std::chars_format::scientific,
                                             std::chars_format::fixed,
                                             std::chars_format::general};
  for (int round = 0; round < rounds; ++round) {
    const double value = random_double(random);
    char text[400];
    for (const std::chars_format format : k_formats) {
      const auto result =
          std::to_chars(std::begin(text), std::end(text), value, format);
      expect_double({text, result.ptr}, value);
    }
  }
}

TEST(zxstr2_number, parse_double_gives_back_what_is_printed) {
  expect_random_doubles_back(20000);
}

TEST(zxstr2_number_slow, parse_double_gives_back_many_that_are_printed) {
  expect_random_doubles_back(2000000);
}

// A number of up to so many digits, with commas, a point, a suffix or an
// exponent by chance.
std::string random_number(std::mt19937& random, std::size_t digits) {
  std::string text(random() % 2, '-');
  const std::size_t count = 1 + random() % digits;
  const std::size_t point = random() % (count + 1);
  for (std::size_t i = 0; i < count; ++i) {
    if (i == point)
      text += '.';
    else if (i < point && i > 0 && random() % 8 == 0)
      text += ',';
    text += k_digits[random() % 10];
  }
  if (random() % 2 == 0)
    text += "e" + std::to_string(static_cast<int>(random() % 80) - 40);
  else if (random() % 2 == 0)
    text += "kKmMgG"[random() % 6];
  return text;
}

TEST(zxstr2_number, parse_double_of_random_numbers_agrees_with_the_slow_model) {
  constexpr unsigned k_seed = 31337;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (int round = 0; round < 100000; ++round)
    expect_double_of_model(random_number(random, 20));
  for (int round = 0; round < 2000; ++round)
    expect_double_of_model(random_number(random, 1000));
}

// ----------------------------------------------------- texts of all kinds --

TEST(zxstr2_number, numbers_are_read_from_every_kind_of_text) {
  const zxStr text("12k");
  const zxIStr inner("12k");
  EXPECT_EQ(parse_long(text), 12000);
  EXPECT_EQ(parse_long(inner), 12000);
  EXPECT_EQ(parse_long("12k"sv), 12000);
  EXPECT_EQ(parse_long({"12k9", 2}), 12);
  EXPECT_EQ(parse_long(zxStr("1") + zxStr("2k")), 12000);
  EXPECT_EQ(parse_double(text), 12000.0);
  EXPECT_EQ(parse_double({"1.55", 3}), 1.5);
  EXPECT_EQ(parse_double(zxStr("1.") + "5"), 1.5);
  EXPECT_EQ(parse_hex(zxStr("1") + "2"), 18U);
  EXPECT_EQ(parse_hex({"12", 1}), 1U);
  EXPECT_EQ(parse_long(zxStr()), 0);
  EXPECT_EQ(parse_double(zxStr()), 0.0);
  EXPECT_EQ(parse_hex(zxStr()), 0U);
  EXPECT_EQ(parse_long(std::string_view()), 0);
  EXPECT_EQ(parse_double(std::string_view()), 0.0);
  EXPECT_EQ(parse_hex(std::string_view()), 0U);
}

TEST(zxstr2_number, no_byte_behind_a_number_is_looked_at) {
  for (const std::string_view text :
       {"", " ", "-", "1", "1,", "1k", "0", "0x", "h", "1.", ".", "1e", "1e+",
        "1e5", "1,000", "12345678901234567890", "1.2345678901234567890e"}) {
    const std::string_view last = regex_run::at_the_end_of_memory(text);
    EXPECT_EQ(parse_long(last), slow_parse_long(text));
    EXPECT_EQ(parse_double(last), slow_parse_double(text));
    EXPECT_EQ(parse_hex(last), parse_hex(std::string(text).c_str()));
  }
}

TEST(zxstr2_number, a_number_from_null_is_an_assertion_and_0) {
  const char* null = nullptr;
  EXPECT_ASSERTION(parse_long(null), "zxstr2");
  EXPECT_ASSERTION(parse_double(null), "zxstr2");
  EXPECT_ASSERTION(parse_hex(null), "zxstr2");
  EXPECT_ASSERTION(parse_long({"12", -1}), "zxstr2");
  kit::with_failures_dropped([&] {
    EXPECT_EQ(parse_long(null), 0);
    EXPECT_EQ(parse_double(null), 0.0);
    EXPECT_EQ(parse_hex(null), 0U);
    EXPECT_EQ(parse_long({"12", INT32_MIN}), 0);
  });
}

}  // namespace
