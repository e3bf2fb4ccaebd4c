// zxsfmt_number.cpp - the texts of doubles.
// Tests: tests/zxlib/zxsfmt_number_test.cpp.
//
// A double is m * 2^e.  Where that times a power of ten fits, its digits are
// those of one whole number, worked out exactly in 128 bits.  All others come
// from std::to_chars, which is exact, rounds ties to even and knows no locale;
// ties are found by the lowest bit of the number.
#include <array>
#include <bit>
#include <charconv>
#include <cmath>
#include <cstring>

#include "zxsfmt_impl.h"

namespace zxsfmt_detail {
namespace {

constexpr int k_default_digits = 15;

// ---- doubles taken apart

// number = mantissa * 2^exponent, the mantissa below 2^53.
struct Parts {
  std::uint64_t mantissa;
  int exponent;
};

Parts parts_of(double number) {
  constexpr int k_mantissa_bits = 52;
  constexpr int k_bias = 1075;
  const auto bits = std::bit_cast<std::uint64_t>(number);
  const std::uint64_t fraction = bits & ((1ULL << k_mantissa_bits) - 1);
  const int exponent = static_cast<int>(bits >> k_mantissa_bits & 0x7FF);
  if (exponent == 0) return {fraction, 1 - k_bias};
  return {fraction | 1ULL << k_mantissa_bits, exponent - k_bias};
}

template <std::size_t count>
constexpr auto make_powers(std::uint64_t base) {
  std::array<std::uint64_t, count> powers{};
  std::uint64_t power = 1;
  for (std::uint64_t& p : powers) {
    p = power;
    power *= base;
  }
  return powers;
}
constexpr auto k_powers_of_10 = make_powers<20>(10);
constexpr auto k_powers_of_5 = make_powers<23>(5);

// True if the number lies exactly half-way between two that have this many
// decimals (fewer than none: so many zeros ahead of the point): an odd number
// of halves.  Its lowest bit tells, and for whole numbers whether the fives
// of those zeros are in it.
bool is_tie(double number, int decimals) {
  const Parts parts = parts_of(number);
  if (parts.mantissa == 0) return false;
  const int zeros = std::countr_zero(parts.mantissa);
  if (parts.exponent + zeros != -(decimals + 1)) return false;
  if (decimals >= 0) return true;
  const auto fives = static_cast<std::size_t>(-decimals);
  return fives < k_powers_of_5.size() &&
         (parts.mantissa >> zeros) % k_powers_of_5[fives] == 0;
}

// ---- by whole numbers

struct Wide {
  std::uint64_t high;
  std::uint64_t low;
};

// By halves, as one of the targets has no larger product.
Wide product(std::uint64_t a, std::uint64_t b) {
  constexpr std::uint64_t k_half = 0xFFFFFFFF;
  const std::uint64_t low = (a & k_half) * (b & k_half);
  const std::uint64_t cross = (a >> 32) * (b & k_half) + (low >> 32);
  const std::uint64_t other = (a & k_half) * (b >> 32) + (cross & k_half);
  return {(a >> 32) * (b >> 32) + (cross >> 32) + (other >> 32),
          other << 32 | (low & k_half)};
}

// wide / 2^shift, a half rounded up, where that fits 64 bits; wide is below
// 2^120, the shift from 1 on.
bool divide_rounded(Wide wide, int shift, std::uint64_t& result) {
  if (shift > 120) {
    result = 0;
    return true;
  }
  if (shift > 64) {
    result = (wide.high + (1ULL << (shift - 65))) >> (shift - 64);
    return true;
  }
  const std::uint64_t half = 1ULL << (shift - 1);
  wide.low += half;
  if (wide.low < half) ++wide.high;
  if (shift == 64) {
    result = wide.high;
    return true;
  }
  if (wide.high >> shift != 0) return false;
  result = wide.high << (64 - shift) | wide.low >> shift;
  return true;
}

// The number times 10^decimals, rounded; false if that is beyond 64 bits or
// not to be had this way.
bool scaled(double number, int decimals, std::uint64_t& result) {
  if (decimals < 0 || decimals >= std::ssize(k_powers_of_10)) return false;
  const Parts parts = parts_of(number);
  const Wide wide = product(parts.mantissa,
                            k_powers_of_10[static_cast<std::size_t>(decimals)]);
  if (parts.exponent < 0) return divide_rounded(wide, -parts.exponent, result);
  const int free_bits = std::countl_zero(wide.low);
  if (wide.high != 0 || parts.exponent > free_bits) return false;
  result = wide.low << parts.exponent;
  return true;
}

// ---- digits of whole numbers
//
// Eight digits at a time, each in a byte of one word, the first in the lowest:
// how many there are is no branch then, which nobody could predict.

static_assert(std::endian::native == std::endian::little);

constexpr std::uint64_t k_zeros = 0x3030303030303030;
constexpr std::uint32_t k_beyond_eight = 100'000'000;

// The two halves of each part of a word, by a multiplication instead of a
// division: parts of 4 digits become parts of 2, these become single ones.
constexpr std::uint64_t digits_by_4(std::uint64_t by_4) {
  const std::uint64_t upper_2 = by_4 * 10'486 >> 20 & 0x0000007F0000007F;
  const std::uint64_t by_2 = upper_2 | (by_4 - 100 * upper_2) << 16;
  const std::uint64_t upper_1 = by_2 * 103 >> 10 & 0x000F000F000F000F;
  return upper_1 | (by_2 - 10 * upper_1) << 8;
}

inline std::uint64_t eight_digits(std::uint32_t number) {
  return digits_by_4(number / 10'000 |
                     static_cast<std::uint64_t>(number % 10'000) << 32);
}

// All eight, zeros in front included.
char* put_eight(char* out, std::uint32_t number) {
  const std::uint64_t digits = eight_digits(number) | k_zeros;
  std::memcpy(out, &digits, 8);
  return out + 8;
}

// A number below k_beyond_eight without zeros in front; it takes 8 bytes.
char* put_up_to_eight(char* out, std::uint32_t number) {
  const std::uint64_t digits = eight_digits(number);
  constexpr std::uint64_t k_last = 1ULL << 56;  // which stays for 0
  const int zeros = std::countr_zero(digits | k_last) / 8;
  const std::uint64_t text = (digits | k_zeros) >> (8 * zeros);
  std::memcpy(out, &text, 8);
  return out + 8 - zeros;
}

// Exactly `count` digits, zeros in front included.
char* put_digits(char* out, std::uint64_t number, int count) {
  if (count > 8) {
    out = put_digits(out, number / k_beyond_eight, count - 8);
    return put_eight(out, static_cast<std::uint32_t>(number % k_beyond_eight));
  }
  const std::uint64_t text =
      (eight_digits(static_cast<std::uint32_t>(number)) | k_zeros) >>
      (8 * (8 - count));
  std::memcpy(out, &text, static_cast<std::size_t>(count));
  return out + count;
}

// ---- rounding of decimal text

// Adds one to the last of the digits; a point among them is stepped over.
// False if they were all 9, which are all 0 then.
bool increment(char* begin, char* end) {
  while (end != begin) {
    --end;
    if (*end == '.') continue;
    if (*end != '9') {
      ++*end;
      return true;
    }
    *end = '0';
  }
  return false;
}

// How a text with one digit too many is to be rounded.
enum class Rounding : std::uint8_t { down, up, unknown };

// `digit` is the digit too many, itself rounded, which hides what a 5 was.
Rounding rounding_of(char digit, double number, int decimals) {
  if (digit != '5') return digit < '5' ? Rounding::down : Rounding::up;
  return is_tie(number, decimals) ? Rounding::up : Rounding::unknown;
}

// ---- significant digits

// d.ddd * 10^exponent
struct Digits {
  char bytes[k_most_digits + 1];
  int count;
  int exponent;
};

// floor(log10(number)) or one less, for numbers from 2^-128 to 2^128.
int exponent_guess(double number) {
  const Parts parts = parts_of(number);
  const int width = 64 - std::countl_zero(parts.mantissa);
  const int log2 = parts.exponent + width - 1;
  return log2 * 1233 >> 12;
}

// Numbers whose digits are those of one whole number, which stands for
// whole / 10^decimals.
struct Scaled {
  std::uint64_t whole;
  int decimals;
};

bool round_by_whole_number(double number, int count, Scaled& result) {
  constexpr double k_least = 1e-18;
  constexpr double k_beyond = 1e18;
  constexpr int k_most = 18;
  if (count > k_most || number < k_least || number >= k_beyond) return false;
  result.decimals = count - 1 - exponent_guess(number);
  if (!scaled(number, result.decimals, result.whole)) return false;
  if (result.whole < k_powers_of_10[static_cast<std::size_t>(count)])
    return true;
  return scaled(number, --result.decimals, result.whole);
}

// Fills in the digits and the exponent from a text as "d.ddde-05".
void read_scientific(const char* text, const char* end, Digits& digits) {
  const auto* e = static_cast<const char*>(
      std::memchr(text, 'e', static_cast<std::size_t>(end - text)));
  digits.bytes[0] = text[0];
  digits.count = 1;
  for (const char* p = text + 2; p < e; ++p) digits.bytes[digits.count++] = *p;
  std::from_chars(e[1] == '+' ? e + 2 : e + 1, end, digits.exponent);
}

void scientific(double number, int count, Digits& digits) {
  char text[k_most_digits + 16];
  const auto end = std::to_chars(text, text + sizeof text, number,
                                 std::chars_format::scientific, count - 1)
                       .ptr;
  read_scientific(text, end, digits);
}

void round_by_text(double number, int count, Digits& digits) {
  scientific(number, count + 1, digits);
  const int decimals = count - 1 - digits.exponent;
  const Rounding rounding = rounding_of(digits.bytes[count], number, decimals);
  if (rounding == Rounding::unknown) return scientific(number, count, digits);
  digits.count = count;
  if (rounding == Rounding::up &&
      !increment(digits.bytes, digits.bytes + count)) {
    digits.bytes[0] = '1';
    ++digits.exponent;
  }
}

// The number rounded to `count` digits, up to k_most_digits.
void round_to_digits(double number, int count, Digits& digits) {
  Scaled rounded;
  digits.count = count;
  if (number == 0) {
    std::memset(digits.bytes, '0', static_cast<std::size_t>(count));
    digits.exponent = 0;
  } else if (round_by_whole_number(number, count, rounded)) {
    put_digits(digits.bytes, rounded.whole, count);
    digits.exponent = count - 1 - rounded.decimals;
  } else {
    round_by_text(number, count, digits);
  }
}

// ---- digits as text

char* copy(char* out, const char* bytes, int count) {
  std::memcpy(out, bytes, static_cast<std::size_t>(count));
  return out + count;
}

char* fill(char* out, char byte, int count) {
  std::memset(out, byte, static_cast<std::size_t>(count));
  return out + count;
}

char* write_power(char* out, int exponent) {
  *out++ = 'e';
  *out++ = exponent < 0 ? '-' : '+';
  exponent = std::abs(exponent);
  *out++ = static_cast<char>('0' + exponent / 100);
  *out++ = static_cast<char>('0' + exponent / 10 % 10);
  *out++ = static_cast<char>('0' + exponent % 10);
  return out;
}

char* write_with_power(char* out, const Digits& digits, bool point) {
  *out++ = digits.bytes[0];
  if (digits.count > 1 || point) *out++ = '.';
  out = copy(out, digits.bytes + 1, digits.count - 1);
  return write_power(out, digits.exponent);
}

// Without a power; the exponent is small.
char* write_plain(char* out, const Digits& digits, bool point) {
  const int whole = digits.exponent + 1;  // digits ahead of the point
  if (whole <= 0) {
    out = copy(out, "0.", 2);
    out = fill(out, '0', -whole);
    return copy(out, digits.bytes, digits.count);
  }
  if (whole >= digits.count) {
    out = copy(out, digits.bytes, digits.count);
    out = fill(out, '0', whole - digits.count);
    if (point) *out++ = '.';
    return out;
  }
  out = copy(out, digits.bytes, whole);
  *out++ = '.';
  return copy(out, digits.bytes + whole, digits.count - whole);
}

// ---- a fixed number of decimals

// whole / 10^decimals
char* write_with_point(char* out, Scaled number) {
  if (number.decimals == 0) return write_whole(out, number.whole);
  const std::uint64_t unit =
      k_powers_of_10[static_cast<std::size_t>(number.decimals)];
  out = write_whole(out, number.whole / unit);
  *out++ = '.';
  return put_digits(out, number.whole % unit, number.decimals);
}

// Takes the zeros at the end of a fraction off, and the point behind which
// nothing is left.
char* strip_zeros(char* end) {
  while (end[-1] == '0') --end;
  return end[-1] == '.' ? end - 1 : end;
}

// Numbers with up to four decimals and 15 digits in all, as tables hold them;
// null for others and for what is no number.
char* write_short(char* out, double number) {
  constexpr double k_beyond = 1e11;
  constexpr double k_unit = 1e4;
  if (!(number < k_beyond)) return nullptr;
  const auto whole = static_cast<std::uint64_t>(number * k_unit + 0.5);
  if (static_cast<double>(whole) / k_unit != number) return nullptr;
  constexpr std::uint64_t k_units = 10'000;
  const std::uint64_t integer = whole / k_units;
  out = integer < k_beyond_eight
            ? put_up_to_eight(out, static_cast<std::uint32_t>(integer))
            : write_whole(out, integer);

  // The point and the digits up to the last that is not 0.
  const std::uint64_t digits = digits_by_4(whole % k_units);
  const std::uint64_t text = '.' | (digits | (k_zeros >> 32)) << 8;
  std::memcpy(out, &text, 8);
  const int used = (64 - std::countl_zero(digits) + 7) / 8;
  return out + used + (used != 0 ? 1 : 0);
}

char* fixed(char* out, double number, int precision) {
  return std::to_chars(out, out + fixed_room(number, precision), number,
                       std::chars_format::fixed, precision)
      .ptr;
}

char* write_fixed_by_text(char* out, double number, int precision) {
  char* end = fixed(out, number, precision + 1) - 1;
  const Rounding rounding = rounding_of(*end, number, precision);
  if (rounding == Rounding::unknown) return fixed(out, number, precision);
  if (precision == 0) --end;  // the point
  if (rounding == Rounding::up && !increment(out, end)) {
    std::memmove(out + 1, out, static_cast<std::size_t>(end - out));
    *out = '1';
    ++end;
  }
  return end;
}

}  // namespace

std::size_t fixed_room(double number, std::int32_t precision) {
  constexpr int k_most_whole = 309;
  constexpr int k_small_whole = 19;
  constexpr int k_rest = 3;  // a point, a digit to round, one more of 999.9
  const int whole = number < 1e18 ? k_small_whole : k_most_whole;
  return static_cast<std::size_t>(whole + k_rest) + zx_size(precision);
}

char* write_fixed(char* out, double number, std::int32_t precision) {
  Scaled number_as = {0, precision};
  if (scaled(number, precision, number_as.whole))
    return write_with_point(out, number_as);
  constexpr std::int32_t k_most_decimals = 1074;
  if (precision <= k_most_decimals)
    return write_fixed_by_text(out, number, precision);
  char* const end = fixed(out, number, k_most_decimals);
  return fill(end, '0', precision - k_most_decimals);
}

char* write_exponent(char* out, double number, std::int32_t precision,
                     bool point) {
  Digits digits;
  round_to_digits(number, precision + 1, digits);
  return write_with_power(out, digits, point);
}

char* write_general(char* out, double number, std::int32_t precision,
                    bool zeros) {
  constexpr double k_least_plain = 1e-4;
  Scaled rounded;
  if (!zeros && number >= k_least_plain &&
      round_by_whole_number(number, precision, rounded)) {
    out = write_with_point(out, rounded);
    return rounded.decimals > 0 ? strip_zeros(out) : out;
  }
  Digits digits;
  round_to_digits(number, precision, digits);
  if (!zeros)
    while (digits.count > 1 && digits.bytes[digits.count - 1] == '0')
      --digits.count;
  if (digits.exponent >= -4 && digits.exponent < precision)
    return write_plain(out, digits, zeros);
  return write_with_power(out, digits, zeros);
}

char* write_whole(char* out, std::uint64_t number) {
  if (number < k_beyond_eight)
    return put_up_to_eight(out, static_cast<std::uint32_t>(number));
  out = write_whole(out, number / k_beyond_eight);
  return put_eight(out, static_cast<std::uint32_t>(number % k_beyond_eight));
}

void append_number(Output& out, double number) {
  constexpr std::int64_t k_room = 32;
  char* end = out.room(k_room);
  if (end == nullptr) return;
  if (std::isnan(number)) return out.take_to(copy(end, "nan", 3));
  if (std::signbit(number)) *end++ = '-';
  number = std::fabs(number);
  if (char* const short_end = write_short(end, number))
    end = short_end;
  else if (std::isinf(number))
    end = copy(end, "inf", 3);
  else
    end = write_general(end, number, k_default_digits, false);
  out.take_to(end);
}

}  // namespace zxsfmt_detail

void append_number(zxStr& out, double number) {
  zxsfmt_detail::Output to(out);
  zxsfmt_detail::append_number(to, number);
}
