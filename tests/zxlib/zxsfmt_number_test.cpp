// zxsfmt_number_test.cpp - the text of numbers: the default form of doubles,
// the directives e E f g G and d i o u x X, each by hand and at random against
// number_model.h; the model against the C library, and the default form
// against the C library directly.
// Tests zxlib/zxsfmt.h and zxsfmt_number.cpp.
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <limits>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "kit/failure.h"
#include "kit/target.h"
#include "kit/text.h"
#include "number_model.h"
#include "zxsfmt.h"

namespace {

using kit::text_of;
using number_model::Decimal;
using number_model::Form;
using limits = std::numeric_limits<double>;

constexpr char k_no_run_time[] =
    "the C library of this target is no authority on digits";

std::string number_text(double number) {
  zxStr text;
  append_number(text, number);
  return text_of(text);
}

// What a format makes of one argument, behind "bad " if it fails.
std::string shown(const std::string& format, const zxFmtArg& arg) {
  zxFmtEnv env;
  zxStr out;
  const bool good = sfmt_core(out, format.c_str(), env, 1, &arg);
  return (good ? "" : "bad ") + text_of(out);
}

// --------------------------------------------------------- random numbers --

// Numbers of many kinds; the same ones in each run and on each target.
class Random {
 public:
  explicit Random(unsigned seed) : engine(seed) {}

  std::uint64_t bits() { return engine(); }
  std::uint64_t below(std::uint64_t limit) { return engine() % limit; }
  bool chance(unsigned percent) { return below(100) < percent; }

  double signed_double(double number) { return chance(50) ? number : -number; }

  // Nearly always huge or tiny.
  double any_bits() { return std::bit_cast<double>(bits()); }

  double finite() {
    double number;
    do number = any_bits();
    while (!std::isfinite(number));
    return number;
  }

  // Whole, up to 2^63 on both sides.
  double whole() {
    return static_cast<double>(static_cast<std::int64_t>(bits()) >> below(64));
  }

  // Of up to 15 digits, of which up to nine are decimals.
  double decimal() {
    const std::uint64_t digits = below(power_of_ten(1 + below(15)));
    return signed_double(static_cast<double>(digits) /
                         static_cast<double>(power_of_ten(below(10))));
  }

  // k / 2^n, which is half-way between two texts of n - 1 decimals.
  double half_way() {
    const double odd = static_cast<double>(bits() >> (12 + below(52)) | 1);
    return signed_double(std::ldexp(odd, -static_cast<int>(below(40))));
  }

  double near(double number) {
    const double aim = signed_double(limits::infinity());
    for (std::uint64_t i = below(4); i > 0; --i)
      number = std::nextafter(number, aim);
    return number;
  }

  // Within the text of 10^-330 to 10^309, infinity included.
  double near_decimal() { return near(decimal()); }

  double near_power_of_ten() {
    const int power = static_cast<int>(below(640)) - 330;
    return signed_double(
        near(std::strtod(("1e" + std::to_string(power)).c_str(), nullptr)));
  }

  double structured() {
    switch (below(6)) {
      case 0:
        return whole();
      case 1:
        return decimal();
      case 2:
        return near_decimal();
      case 3:
        return half_way();
      case 4:
        return near_power_of_ten();
      default:
        return near(whole());
    }
  }

  Form form(std::string_view letters) {
    Form form;
    for (const char flag : std::string_view("-+ #"))
      if (chance(25)) form.flags += flag;
    if (chance(70)) form.width = static_cast<int>(below(61));
    if (chance(25)) form.flags += '0';
    if (chance(70)) form.precision = static_cast<int>(below(61));
    if (chance(30)) form.precision = static_cast<int>(below(9));
    form.letter = letters[static_cast<std::size_t>(below(letters.size()))];
    return form;
  }

 private:
  static std::uint64_t power_of_ten(std::uint64_t power) {
    std::uint64_t result = 1;
    for (; power > 0; --power) result *= 10;
    return result;
  }

  std::mt19937_64 engine;
};

// The directive of a form, as in "%+-10.3g".
std::string directive(const Form& form, bool with_l = false) {
  std::string text = "%" + form.flags;
  if (form.width > 0) text += std::to_string(form.width);
  if (form.precision >= 0) text += "." + std::to_string(form.precision);
  if (with_l) text += 'l';
  return text + form.letter;
}

// ------------------------------------------- the default form of doubles --

TEST(zxsfmt_number, numbers_worked_out_by_hand) {
  const struct {
    double number;
    const char* text;
  } rows[] = {
      {0.0, "0"},
      {-0.0, "-0"},
      {1.0, "1"},
      {-1.0, "-1"},
      {10.0, "10"},
      {12.5, "12.5"},
      {0.1, "0.1"},
      {-0.001, "-0.001"},
      {1.0 / 3.0, "0.333333333333333"},
      {2.0 / 3.0, "0.666666666666667"},
      {200.0 / 3.0, "66.6666666666667"},
      {100000.0, "100000"},
      {123456789.0, "123456789"},
      {123456789012345.0, "123456789012345"},
      {1234567890123456.0, "1.23456789012346e+015"},
      {1e14, "100000000000000"},
      {1e15, "1e+015"},
      {-1e15, "-1e+015"},
      {999999999999999.0, "999999999999999"},
      {999999999999999.875, "1e+015"},
      {0.0001, "0.0001"},
      {0.00012, "0.00012"},
      {0.00001234, "1.234e-005"},
      {0.00009999999999999999, "0.0001"},
      {0.0000999999999999999, "9.99999999999999e-005"},
      {0.00000001, "1e-008"},
      {1e99, "1e+099"},
      {1e100, "1e+100"},
      {1e-99, "1e-099"},
      {1e-100, "1e-100"},
      {1.7976931348623157e308, "1.79769313486232e+308"},
      {2.2250738585072014e-308, "2.2250738585072e-308"},
      {4.9406564584124654e-324, "4.94065645841247e-324"},
      {-4.9406564584124654e-324, "-4.94065645841247e-324"},
      {limits::infinity(), "inf"},
      {-limits::infinity(), "-inf"},
      {limits::quiet_NaN(), "nan"},
      {-limits::quiet_NaN(), "nan"},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(number_text(row.number), row.text);
    EXPECT_EQ(text_of(sfmt("#", row.number)), row.text);
  }
}

// Numbers exactly half-way between two texts of 15 digits.  Going to the even
// digit would give another text for most of them.
TEST(zxsfmt_number, exact_ties_go_away_from_zero) {
  const struct {
    double number;
    const char* text;
  } rows[] = {
      {1234567890123.125, "1234567890123.13"},
      {-1234567890123.125, "-1234567890123.13"},
      {123456789012344.5, "123456789012345"},
      {100000000000000.5, "100000000000001"},
      {4398046511104.125, "4398046511104.13"},  // 2^42 + 1/8
      {1000000000000005.0, "1.00000000000001e+015"},
      {-1000000000000005.0, "-1.00000000000001e+015"},
      {1234567890123465.0, "1.23456789012347e+015"},
      {10000000000000050.0, "1.00000000000001e+016"},
      {2.384185791015625e-7, "2.38418579101563e-007"},  // 2^-22
      {-2.384185791015625e-7, "-2.38418579101563e-007"},
      {4.76837158203125e-7, "4.76837158203125e-007"},  // 2^-21, 15 digits
      {999999999999999.5, "1e+015"},
      {9007199254740985.0, "9.00719925474099e+015"},
  };
  for (const auto& row : rows) EXPECT_EQ(number_text(row.number), row.text);
}

TEST(zxsfmt_number, the_neighbours_of_a_tie_go_to_their_own_side) {
  constexpr double k_tie = 1234567890123.125;
  EXPECT_EQ(number_text(std::nextafter(k_tie, 0.0)), "1234567890123.12");
  EXPECT_EQ(number_text(std::nextafter(k_tie, 2e12)), "1234567890123.13");
}

TEST(zxsfmt_number, a_number_is_appended_to_what_is_there) {
  zxStr text = "x=";
  append_number(text, -2.5);
  EXPECT_EQ(text_of(text), "x=-2.5");
}

void expect_default_texts(unsigned seed, int count, double (Random::*kind)()) {
  Random random(seed);
  for (int i = 0; i < count; ++i) {
    const double x = (random.*kind)();
    ASSERT_EQ(number_text(x), number_model::default_text(x))
        << std::hex << std::bit_cast<std::uint64_t>(x);
  }
}

TEST(zxsfmt_number, random_bits_have_their_default_form) {
  expect_default_texts(1, 50'000, &Random::any_bits);
}

TEST(zxsfmt_number, whole_numbers_have_their_default_form) {
  expect_default_texts(2, 50'000, &Random::whole);
}

TEST(zxsfmt_number, decimals_have_their_default_form) {
  expect_default_texts(3, 100'000, &Random::decimal);
}

TEST(zxsfmt_number, halves_have_their_default_form) {
  expect_default_texts(4, 100'000, &Random::half_way);
}

TEST(zxsfmt_number, neighbours_of_powers_of_ten_have_their_default_form) {
  expect_default_texts(5, 30'000, &Random::near_power_of_ten);
}

TEST(zxsfmt_number, neighbours_of_decimals_have_their_default_form) {
  expect_default_texts(6, 100'000, &Random::near_decimal);
}

// All powers of two and ten, and what is beside them.
TEST(zxsfmt_number, each_power_has_its_default_form) {
  std::vector<double> powers;
  for (int n = -1074; n <= 1023; ++n) powers.push_back(std::ldexp(1.0, n));
  for (int n = -323; n <= 308; ++n)
    powers.push_back(std::strtod(("1e" + std::to_string(n)).c_str(), nullptr));
  for (const double power : powers) {
    for (const double x : {power, std::nextafter(power, 0.0),
                           std::nextafter(power, limits::infinity())})
      ASSERT_EQ(number_text(x), number_model::default_text(x)) << power;
  }
}

// --------------------------------------- the directives e, E, f, g and G --

struct Row {
  const char* format;
  double number;
  const char* text;
};

void expect_rows(const std::vector<Row>& rows) {
  for (const Row& row : rows)
    EXPECT_EQ(shown(row.format, row.number), row.text)
        << row.format << " of " << row.number;
}

TEST(zxsfmt_number, exponents_have_three_digits_at_least) {
  expect_rows({
      {"%e", 1, "1.000000e+000"},
      {"%e", 0, "0.000000e+000"},
      {"%E", -0.001, "-1.000000E-003"},
      {"%.2e", 1.5e99, "1.50e+099"},
      {"%.2e", 1.5e100, "1.50e+100"},
      {"%.2e", 1.5e-100, "1.50e-100"},
      {"%.0e", 9.6e99, "1e+100"},
      {"%g", 1e6, "1e+006"},
      {"%g", 0.00001, "1e-005"},
      {"%G", 0.00001, "1E-005"},
      {"%.3g", 1.5e300, "1.5e+300"},
  });
}

// Blanks and zeros are filled in afterwards.
TEST(zxsfmt_number, the_third_digit_of_an_exponent_counts_in_the_width) {
  expect_rows({
      {"%014.3e", 12345, "00001.235e+004"},
      {"%014.3e", -12345, "-0001.235e+004"},
      {"%12.3e", 12345, "  1.235e+004"},
      {"%10.3e", 12345, "1.235e+004"},
      {"%-12.3e|", 12345, "1.235e+004  |"},
      {"%8g", 1e7, "  1e+007"},
      {"%08g", 1e7, "001e+007"},
  });
}

TEST(zxsfmt_number, exact_ties_of_directives_go_away_from_zero) {
  expect_rows({
      {"%.0f", 0.5, "1"},
      {"%.0f", 1.5, "2"},
      {"%.0f", 2.5, "3"},
      {"%.0f", -2.5, "-3"},
      {"%.0f", 0.49999999999999994, "0"},
      {"%.0f", 9.5, "10"},
      {"%.0f", 4503599627370497.5, "4503599627370498"},
      {"%.0f", 2251799813685248.5, "2251799813685249"},
      {"%.1f", 0.25, "0.3"},
      {"%.1f", 0.35, "0.3"},  // the double is below
      {"%.2f", 0.125, "0.13"},
      {"%.2f", 2.675, "2.67"},  // the double is below
      {"%f", 0.00000095367431640625, "0.000001"},
      {"%.19f", 9.5367431640625e-7, "0.0000009536743164063"},  // 2^-20
      {"%.0e", 2.5, "3e+000"},
      {"%.0e", 25, "3e+001"},
      {"%.0e", 24.999, "2e+001"},
      {"%.0e", 9.5, "1e+001"},
      {"%.3e", 12345, "1.235e+004"},
      {"%.0E", -450, "-5E+002"},
      {"%.1g", 0.25, "0.3"},
      {"%.0g", 25, "3e+001"},
      {"%.2g", 0.0000125, "1.3e-005"},  // the double is above
      {"%g", 1234565, "1.23457e+006"},
      {"%g", 999999.5, "1e+006"},
      {"%g", 99999.95, "99999.9"},  // the double is below
      {"%.1g", 9.5, "1e+001"},
      {"%.2g", 99.5, "1e+002"},
      {"%.15g", 1000000000000005.0, "1.00000000000001e+015"},
  });
}

TEST(zxsfmt_number, numbers_are_printed_with_all_the_digits_asked_for) {
  expect_rows({
      {"%.60f", 0.1,
       "0.100000000000000005551115123125782702118158340454101562500000"},
      {"%.17g", 0.1, "0.10000000000000001"},
      {"%.60g", 0.5, "0.5"},
      {"%.3f", 1e22, "10000000000000000000000.000"},
      {"%.3f", 1e23, "99999999999999991611392.000"},
      {"%.22e", 1e23, "9.9999999999999991611392e+022"},
      {"%.0f", 5e-324, "0"},
      {"%.5e", 5e-324, "4.94066e-324"},
      {"%.2f", 1e-9, "0.00"},
      {"%.2f", -1e-9, "-0.00"},
      {"%f", -0.0, "-0.000000"},
      {"%g", -0.0, "-0"},
      {"%f", 1.5, "1.500000"},
      {"%.f", 1.25, "1"},
      {"%.g", 1.25, "1"},
  });
}

TEST(zxsfmt_number, flags_of_doubles) {
  expect_rows({
      {"%+.1f", 0.5, "+0.5"},
      {"%+.1f", -0.5, "-0.5"},
      {"% .1f", 0.5, " 0.5"},
      {"% +.1f", 0.5, "+0.5"},
      {"%8.1f|", 0.5, "     0.5|"},
      {"%-8.1f|", 0.5, "0.5     |"},
      {"%08.1f", -0.5, "-00000.5"},
      {"%+08.1f", 0.5, "+00000.5"},
      {"%-08.1f|", 0.5, "0.5     |"},
      {"%#.0f", 1, "1."},
      {"%#.0e", 1, "1.e+000"},
      {"%#g", 1, "1.00000"},
      {"%#.3g", 100, "100."},
      {"%#.3g", 1000, "1.00e+003"},
      {"%#g", 0, "0.00000"},
      {"%#.2g", 99.99, "1.0e+002"},
      {"%8.1lf", 0.5, "     0.5"},
      {"%lg", 0.5, "0.5"},
  });
}

TEST(zxsfmt_number, infinity_and_nan_have_words) {
  expect_rows({
      {"%f", limits::infinity(), "inf"},
      {"%.2e", -limits::infinity(), "-inf"},
      {"%g", limits::quiet_NaN(), "nan"},
      {"%g", -limits::quiet_NaN(), "nan"},
      {"%6.1f|", limits::infinity(), "   inf|"},
      {"%-6f|", -limits::infinity(), "-inf  |"},
      {"%+f", limits::infinity(), "+inf"},
      {"%06f", limits::infinity(), "   inf"},
  });
}

// Doubles whose text has more than 255 bytes fail an assertion, which the
// random forms leave out.
constexpr std::size_t k_longest = 255;

TEST(zxsfmt_number, a_text_of_256_bytes_fails_an_assertion) {
  zxFmtEnv env;
  zxStr out;
  const auto fails = [&](const char* format, double number) {
    const zxFmtArg arg = number;
    return kit::failure_of([&] { sfmt_core(out, format, env, 1, &arg); })
        .message.starts_with("1000: bailed out: zxsfmt");
  };
  EXPECT_EQ(shown("%255.1f", 0.5), std::string(252, ' ') + "0.5");
  EXPECT_TRUE(fails("%256.1f", 0.5));
  EXPECT_EQ(shown("%.253f", 0.5), "0.5" + std::string(252, '0'));
  EXPECT_TRUE(fails("%.254f", 0.5));
  EXPECT_TRUE(fails("%+.253f", 0.5));
  EXPECT_EQ(shown("%.0f", std::ldexp(1.0, 845)).size(), 255U);
  EXPECT_TRUE(fails("%.0f", std::ldexp(1.0, 848)));
  EXPECT_EQ(shown("%.248e", 0.5), "5." + std::string(248, '0') + "e-001");
  EXPECT_TRUE(fails("%.249e", 0.5));
  EXPECT_TRUE(fails("%f", 1e300));
}

void expect_directives(unsigned seed, int count, double (Random::*kind)()) {
  Random random(seed);
  int compared = 0;
  while (compared < count) {
    const double x = (random.*kind)();
    const Form form = random.form("eEfgG");
    if (!std::isfinite(x)) continue;
    const std::string expected = number_model::text_of(x, form);
    if (expected.size() > k_longest) continue;
    ASSERT_EQ(shown(directive(form, random.chance(10)), x), expected)
        << directive(form) << " of " << std::hex
        << std::bit_cast<std::uint64_t>(x);
    ++compared;
  }
}

TEST(zxsfmt_number, random_forms_of_random_bits) {
  expect_directives(7, 40'000, &Random::finite);
}

TEST(zxsfmt_number, random_forms_of_everyday_numbers) {
  expect_directives(8, 150'000, &Random::structured);
}

TEST(zxsfmt_number, random_forms_of_halves) {
  expect_directives(9, 50'000, &Random::half_way);
}

TEST(zxsfmt_number_slow, five_million_forms_of_doubles) {
  expect_directives(10, 1'000'000, &Random::finite);
  expect_directives(11, 4'000'000, &Random::structured);
}

// --------------------------------------- the directives d, i, o, u, x, X --

struct IntegerRow {
  const char* format;
  zxFmtArg arg;
  const char* text;
};

TEST(zxsfmt_number, integers_worked_out_by_hand) {
  const IntegerRow rows[] = {
      {"%d", 0, "0"},
      {"%d", -42, "-42"},
      {"%i", -42, "-42"},
      {"%d", std::numeric_limits<std::int32_t>::min(), "-2147483648"},
      {"%u", -1, "4294967295"},
      {"%d", 4294967295U, "-1"},
      {"%d", 4294967295UL, "-1"},
      {"%u", 4294967295UL, "4294967295"},
      {"%ld", long{-1}, "-1"},
      {"%lu", long{-1}, "4294967295"},
      {"%lx", long{-1}, "ffffffff"},
      {"%x", '\xC8', "ffffffc8"},
      {"%d", '\xC8', "-56"},
      {"%x", static_cast<unsigned char>(200), "c8"},
      {"%d", static_cast<unsigned char>(200), "200"},
      {"%o", 8, "10"},
      {"%#o", 8, "010"},
      {"%#o", 0, "0"},
      {"%#.0o", 0, "0"},
      {"%#x", 255, "0xff"},
      {"%#X", 255, "0XFF"},
      {"%#x", 0, "0"},
      {"%5d", 42, "   42"},
      {"%-5d|", 42, "42   |"},
      {"%05d", -42, "-0042"},
      {"%-05d|", -42, "-42  |"},
      {"%+d", 42, "+42"},
      {"% d", 42, " 42"},
      {"% +d", 42, "+42"},
      {"%+u", 42, "42"},
      {"%.4d", -42, "-0042"},
      {"%7.4d", -42, "  -0042"},
      {"%07.4d", -42, "  -0042"},  // a precision takes the zeros' place
      {"%.0d", 0, ""},
      {"%.d", 0, ""},
      {"%3.0d", 0, "   "},
      {"%+.0d", 0, "+"},
      {"%#8x", 255, "    0xff"},
      {"%#08x", 255, "0x0000ff"},
      {"%#.4x", 255, "0x00ff"},
      {"%#.4o", 8, "0010"},
  };
  for (const IntegerRow& row : rows)
    EXPECT_EQ(shown(row.format, row.arg), row.text) << row.format;
}

// The records that hold an integer, each with the 32 bits that it stands for.
struct IntegerArg {
  zxFmtArg arg;
  std::uint32_t bits;
};

std::vector<IntegerArg> integer_args(std::uint32_t bits) {
  const auto number = static_cast<std::int32_t>(bits);
  const auto byte = static_cast<unsigned char>(bits);
  const auto character = static_cast<signed char>(byte);
  zxFmtArg truth = static_cast<std::int32_t>(bits & 1);
  truth.tag = zxFmtArg::k_bool;
  return {{number, bits},
          {static_cast<long>(number), bits},
          {bits, bits},
          {static_cast<unsigned long>(bits), bits},
          {static_cast<char>(character),
           static_cast<std::uint32_t>(std::int32_t{character})},
          {byte, byte},
          {truth, bits & 1}};
}

constexpr std::uint32_t k_words[] = {
    0,     1,     7,          8,          42,         127,        128,
    200,   255,   1000,       65535,      1000000000, 0x7FFFFFFF, 0x80000000,
    33333, 99999, 0xFFFFFFFF, 0xFFFFFFD6, 0xFFFFFF80, 0xDEADBEEF};

// Every set of flags with the widths and precisions below.
void for_each_form(const std::function<void(const Form&)>& take) {
  for (unsigned set = 0; set < 32; ++set)
    for (const int width : {0, 1, 2, 5, 11, 12, 60})
      for (const int precision : {-1, 0, 1, 2, 5, 11, 60})
        for (const char letter : std::string_view("diouxX")) {
          Form form{"", width, precision, letter};
          for (unsigned i = 0; i < 5; ++i)
            if (set >> i & 1) form.flags += "-+ #0"[i];
          take(form);
        }
}

TEST(zxsfmt_number, every_form_of_integers) {
  unsigned next = 0;
  for_each_form([&](const Form& form) {
    const std::uint32_t word = k_words[next++ % std::size(k_words)];
    for (const IntegerArg& row : integer_args(word))
      ASSERT_EQ(shown(directive(form, next % 3 == 0), row.arg),
                number_model::text_of(row.bits, form))
          << directive(form) << " of " << row.bits;
  });
}

TEST(zxsfmt_number, random_forms_of_integers) {
  Random random(12);
  for (int i = 0; i < 20'000; ++i) {
    const Form form = random.form("diouxX");
    const auto word =
        static_cast<std::uint32_t>(random.bits() >> (32 + random.below(32)));
    for (const IntegerArg& row : integer_args(random.chance(50) ? word : ~word))
      ASSERT_EQ(shown(directive(form, random.chance(10)), row.arg),
                number_model::text_of(row.bits, form))
          << directive(form) << " of " << row.bits;
  }
}

// ------------------------------------------------ against the C library --

std::string run_time_text(const std::string& format, auto... values) {
  std::vector<char> text(2000);
  std::snprintf(text.data(), text.size(), format.c_str(), values...);
  return text.data();
}

// True where the run time of the Windows target strays from the standard: it
// shows signs under letters without sign, and no digit for a zero in octal
// without digits.
bool is_told_wrongly(std::uint32_t word, const Form& form) {
  if (!kit::on_windows() || form.letter == 'd' || form.letter == 'i')
    return false;
  return form.has('+') || form.has(' ') ||
         (form.letter == 'o' && form.precision == 0 && word == 0);
}

TEST(zxsfmt_number, the_model_knows_integers_as_the_run_time_does) {
  for_each_form([](const Form& form) {
    for (const std::uint32_t word : k_words) {
      if (is_told_wrongly(word, form)) continue;
      ASSERT_EQ(number_model::text_of(word, form),
                run_time_text(directive(form), word))
          << directive(form) << " of " << word;
    }
  });
}

// All digits of a number, by the run time.
Decimal run_time_digits(double number) {
  const std::string text = run_time_text("%.1080e", std::fabs(number));
  const std::size_t e = text.find('e');
  std::string digits = text.substr(0, 1) + text.substr(2, e - 2);
  digits.erase(std::min(digits.find_last_not_of('0') + 1, digits.size()));
  if (digits.empty()) digits = "0";
  return {digits, std::atoi(text.c_str() + e + 1)};
}

// The exact digits as the model tells them may end in zeros.
Decimal model_digits(double number) {
  Decimal decimal = number_model::exact(number);
  while (decimal.digits.size() > 1 && decimal.digits.back() == '0')
    decimal.digits.pop_back();
  return decimal;
}

TEST(zxsfmt_number, the_model_knows_digits_as_the_run_time_does) {
  if (kit::on_windows()) GTEST_SKIP() << k_no_run_time;
  Random random(13);
  for (int i = 0; i < 20'000; ++i) {
    const double x = i % 2 == 0 ? random.finite() : random.structured();
    if (!std::isfinite(x)) continue;
    const Decimal ours = model_digits(x);
    const Decimal theirs = run_time_digits(x);
    ASSERT_EQ(ours.digits, theirs.digits) << x;
    ASSERT_EQ(ours.exponent, theirs.exponent) << x;
  }
}

// The run time's text with an exponent of three digits.
std::string widened(const std::string& text) {
  const std::size_t e = text.find_first_of("eE");
  if (e == text.npos || text.size() - e > 4) return text;
  return text.substr(0, e + 2) + "0" + text.substr(e + 2);
}

// How many significant digits a form keeps of a number.
int digits_kept(const Decimal& number, const Form& form) {
  const int precision = form.precision < 0 ? 6 : form.precision;
  if (form.letter == 'f') return number.exponent + 1 + precision;
  if (form.letter == 'e' || form.letter == 'E') return 1 + precision;
  return std::max(precision, 1);
}

// True if a form has to decide between two texts that are equally near.
bool is_tie(const Decimal& number, const Form& form) {
  const int kept = digits_kept(number, form);
  return static_cast<int>(number.digits.size()) == kept + 1 &&
         number.digits.back() == '5';
}

// True where the run time is known to drop a zero that "#" keeps: under g, of
// what rounds up to a power of ten, as in "%#.2g" of 99.99.
bool is_told_wrongly(const Decimal& number, const Form& form) {
  if ((form.letter != 'g' && form.letter != 'G') || !form.has('#'))
    return false;
  const Decimal rounded =
      number_model::rounded(number, digits_kept(number, form));
  return rounded.exponent != number.exponent;
}

TEST(zxsfmt_number, the_model_lays_out_as_the_run_time_does) {
  if (kit::on_windows()) GTEST_SKIP() << k_no_run_time;
  Random random(14);
  int compared = 0;
  for (int i = 0; i < 60'000; ++i) {
    const double x = i % 4 == 0 ? random.finite() : random.structured();
    Form form = random.form("eEfgG");
    if (!std::isfinite(x)) continue;
    const Decimal digits = model_digits(x);
    if (is_tie(digits, form) || is_told_wrongly(digits, form)) continue;
    if (form.letter != 'f') form.width = 0;
    ASSERT_EQ(number_model::text_of(x, form),
              widened(run_time_text(directive(form), x)))
        << directive(form) << " of " << x;
    ++compared;
  }
  EXPECT_GT(compared, 50'000);
}

// ---- the default form: the run time's text, widened, ties corrected

// A number as digits and a power of ten: d.dd... x 10^exponent, of exactly
// 15 digits.
struct Digits {
  bool negative;
  std::uint64_t digits;
  int exponent;
};

constexpr std::uint64_t k_ten_to_14 = 100'000'000'000'000;
constexpr std::uint64_t k_ten_to_15 = 10 * k_ten_to_14;
constexpr std::uint64_t k_ten_to_16 = 10 * k_ten_to_15;

std::string with_point(std::string digits, std::size_t place) {
  digits.insert(place, ".");
  while (digits.back() == '0') digits.pop_back();
  if (digits.back() == '.') digits.pop_back();
  return digits;
}

std::string exponent_text(int exponent) {
  char text[16];
  std::snprintf(text, sizeof text, "e%c%03d", exponent < 0 ? '-' : '+',
                std::abs(exponent));
  return text;
}

// The digits laid out as the default form asks.
std::string laid_out(const Digits& number) {
  const std::string digits = std::to_string(number.digits);
  const std::string sign = number.negative ? "-" : "";
  const int exponent = number.exponent;
  if (exponent < -4 || exponent >= 15)
    return sign + with_point(digits, 1) + exponent_text(exponent);
  if (exponent >= 0)
    return sign + with_point(digits, static_cast<std::size_t>(exponent) + 1);
  const std::string zeros(static_cast<std::size_t>(-exponent), '0');
  return sign + with_point(zeros + digits, 1);
}

// The text of a number of 16 digits that ends in 5, with the power of ten of
// its first digit.
std::string text_of_tie(bool negative, std::uint64_t digits, int exponent) {
  std::uint64_t rounded = digits / 10 + 1;
  if (rounded == k_ten_to_15) {
    rounded = k_ten_to_14;
    ++exponent;
  }
  return laid_out({negative, rounded, exponent});
}

// True, with the digits, if the number has exactly 16 digits of which the
// last is a 5.  With an odd m and x = m / 2^k the digits are those of
// m * 5^k, and the last is a 5 by itself; in whole numbers it has to be
// looked for.
bool is_default_tie(double x, std::uint64_t& digits, int& exponent) {
  int power = 0;
  const double fraction = std::frexp(std::fabs(x), &power);
  auto m = static_cast<std::uint64_t>(std::ldexp(fraction, 53));
  if (m == 0) return false;
  int k = 53 - power;
  for (; m % 2 == 0; m /= 2) --k;
  if (k < 0) {  // the one even number of this kind: 10 times 16 digits
    digits = m / 5;
    exponent = 16;
    return k == -1 && m % 50 == 25 && digits >= k_ten_to_15;
  }
  if (k > 22) return false;
  for (int i = 0; i < k; ++i) {
    if (m > k_ten_to_16 / 5) return false;
    m *= 5;
  }
  digits = m;
  exponent = 15 - k;
  return m >= k_ten_to_15 && m < k_ten_to_16 && m % 10 == 5;
}

std::string expected_text(double x) {
  if (std::isnan(x)) return "nan";
  if (std::isinf(x)) return x < 0 ? "-inf" : "inf";
  std::uint64_t digits = 0;
  int exponent = 0;
  if (is_default_tie(x, digits, exponent))
    return text_of_tie(std::signbit(x), digits, exponent);
  char buffer[64];
  std::snprintf(buffer, sizeof buffer, "%.15g", x);
  std::string text = buffer;
  const std::size_t e = text.find('e');
  if (e == text.npos) return text;
  return text.substr(0, e) + exponent_text(std::atoi(text.c_str() + e + 1));
}

void expect_random_numbers(std::uint64_t count, unsigned seed) {
  Random random(seed);
  zxStr text;
  for (std::uint64_t i = 0; i < count; ++i) {
    const double x = random.any_bits();
    text.set_length(0);
    append_number(text, x);
    const std::string expected = expected_text(x);
    ASSERT_EQ(text.view(), expected)
        << std::hex << std::bit_cast<std::uint64_t>(x);
  }
}

TEST(zxsfmt_number, ties_by_hand_are_known) {
  EXPECT_EQ(expected_text(1234567890123.125), "1234567890123.13");
  EXPECT_EQ(expected_text(1000000000000005.0), "1.00000000000001e+015");
  EXPECT_EQ(expected_text(10000000000000050.0), "1.00000000000001e+016");
  EXPECT_EQ(expected_text(999999999999999.5), "1e+015");
  EXPECT_EQ(expected_text(std::ldexp(1.0, -22)), "2.38418579101563e-007");
  EXPECT_EQ(laid_out({true, 123'450'000'000'000, -2}), "-0.012345");
  EXPECT_EQ(laid_out({false, 120'000'000'000'000, 2}), "120");
}

TEST(zxsfmt_number, random_bits_are_numbers_as_the_run_time_writes_them) {
  if (kit::on_windows()) GTEST_SKIP() << k_no_run_time;
  expect_random_numbers(300'000, 15);
}

TEST(zxsfmt_number, random_ties_go_away_from_zero) {
  Random random(16);
  constexpr std::uint64_t k_largest = std::uint64_t{1} << 53;
  std::uint64_t scale = 1;  // 5^k
  for (int k = 0; k <= 22; ++k, scale *= 5) {
    const std::uint64_t low = (k_ten_to_15 + scale - 1) / scale;
    const std::uint64_t high = std::min((k_ten_to_16 - 1) / scale, k_largest);
    for (int i = 0; i < 5000; ++i) {
      const std::uint64_t m = (low + random.below(high - low + 1)) | 1;
      const std::uint64_t digits = m * scale;
      if (m > high || digits % 10 != 5) continue;
      const bool negative = random.chance(50);
      const double x =
          std::ldexp(static_cast<double>(m), -k) * (negative ? -1 : 1);
      ASSERT_EQ(number_text(x), text_of_tie(negative, digits, 15 - k))
          << m << " / 2^" << k;
    }
  }
}

TEST(zxsfmt_number_slow, fifty_million_random_numbers) {
  expect_random_numbers(50'000'000, 17);
}

}  // namespace
