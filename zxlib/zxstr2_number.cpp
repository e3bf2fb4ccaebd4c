// zxstr2_number.cpp - numbers read from texts.
// Tests: tests/zxlib/zxstr2_test.cpp.
#include <charconv>
#include <cmath>
#include <iterator>
#include <limits>
#include <system_error>

#include "zxstr2.h"

namespace {

// The value of a digit; 10 and more for any other character.
unsigned digit_of(char byte) { return static_cast<unsigned char>(byte) - 48U; }

// The place behind white space.
inline const char* behind_space(const char* at, const char* end) {
  while (at != end && zx_is_space(*at)) ++at;
  return at;
}

// The end of a text without the white space there.
inline const char* end_of_text(const char* at, const char* end) {
  while (at != end && zx_is_space(end[-1])) --end;
  return end;
}

// Takes a sign; true if it is a minus.
inline bool takes_minus(const char*& at, const char* end) {
  if (at == end || (*at != '-' && *at != '+')) return false;
  return *at++ == '-';
}

// True if a comma at that place is followed by a digit.
bool is_comma_in_number(const char* at, const char* end) {
  return *at == ',' && end - at > 1 && zx_is_digit(at[1]);
}

}  // namespace

// --------------------------------------------------------- whole numbers --

namespace {

// What the text behind its digits multiplies a number by; 0 if it may not
// stand there.
std::uint32_t factor_of(std::string_view suffix, std::uint32_t number) {
  if (suffix.empty()) return 1;
  if (suffix.size() > 1) return 0;
  switch (suffix.front()) {
    case 'k':
      return 1000;
    case 'm':
      return 1000000;
    case 'K':
      return number < 2147483 ? 1000 : 0;
    case 'M':
      return number < 2147 ? 1000000 : 0;
    default:
      return 0;
  }
}

}  // namespace

std::int32_t parse_long(zxChars text) {
  const char* const end = text.view().data() + text.view().size();
  const char* at = behind_space(text.view().data(), end);
  const bool is_negative = takes_minus(at, end);
  std::uint32_t value = 0;
  for (; at != end; ++at) {
    const unsigned digit = digit_of(*at);
    if (digit < 10) {
      value = value * 10 + digit;
      if (value > INT32_MAX) return 0;
    } else if (value == 0 || !is_comma_in_number(at, end)) {
      value *= factor_of({at, end_of_text(at, end)}, value);
      break;
    }
  }
  return static_cast<std::int32_t>(is_negative ? 0 - value : value);
}

std::uint32_t parse_hex(zxChars chars) {
  std::string_view text = chars.view();
  while (text.starts_with(' ')) text.remove_prefix(1);
  if (text.starts_with("0x") || text.starts_with("0X")) text.remove_prefix(2);
  if (text.ends_with('h') || text.ends_with('H')) text.remove_suffix(1);
  std::uint32_t value = 0;
  for (const char byte : text) {
    const unsigned letter = static_cast<unsigned char>(zx_lower(byte)) - 97U;
    if (!zx_is_digit(byte) && letter >= 6) return 0;
    value = value << 4 | (zx_is_digit(byte) ? digit_of(byte) : letter + 10);
  }
  return value;
}

// --------------------------------------------------------------- doubles --

namespace {

// A number as it stands in a text: its digits, up to `end`, with commas and a
// point among them, times 10^exponent.
struct Decimal {
  const char* digits;
  const char* end;
  std::int64_t count = 0;      // of digits
  std::uint64_t mantissa = 0;  // all of them, if these are 19 at most
  std::int64_t exponent = 0;   // of the mantissa
};
constexpr std::int64_t k_mantissa_digits = 19;

// Exponents beyond it outweigh the digits of every text.
constexpr std::int64_t k_huge_exponent = 1000000000000;

// Takes digits into the mantissa; the place behind them.
inline const char* take_digits(std::uint64_t& mantissa, const char* at,
                               const char* end) {
  std::uint64_t value = mantissa;
  for (; at != end && digit_of(*at) < 10; ++at)
    value = value * 10 + digit_of(*at);
  mantissa = value;
  return at;
}

// Reads the digits ahead of the decimal point, and those behind it; the place
// where they end.
inline const char* read_digits(Decimal& number, const char* at,
                               const char* end) {
  const char* const start = at;
  number.digits = at;
  at = take_digits(number.mantissa, at, end);
  number.count = at - start;
  while (at != start && at != end && is_comma_in_number(at, end)) {
    const char* const group = at + 1;
    at = take_digits(number.mantissa, group, end);
    number.count += at - group;
  }
  if (at != end && *at == '.') {
    const char* const decimals = at + 1;
    at = take_digits(number.mantissa, decimals, end);
    number.count += at - decimals;
    number.exponent = decimals - at;
  }
  number.end = at;
  return at;
}

// Reads the suffix, which is the last character.
bool read_suffix(Decimal& number, char suffix) {
  switch (zx_lower(suffix)) {
    case 'k':
      number.exponent += 3;
      return true;
    case 'm':
      number.exponent += 6;
      return true;
    case 'g':
      number.exponent += 9;
      return true;
    default:
      return false;
  }
}

// Reads "e", a sign and digits, up to the end.
bool read_exponent(Decimal& number, const char* at, const char* end) {
  if (zx_lower(*at++) != 'e') return false;
  const bool is_negative = takes_minus(at, end);
  if (at == end) return false;
  std::int64_t exponent = 0;
  for (; at != end; ++at) {
    if (!zx_is_digit(*at)) return false;
    if (exponent < k_huge_exponent) exponent = exponent * 10 + digit_of(*at);
  }
  number.exponent += is_negative ? -exponent : exponent;
  return true;
}

// Reads what stands behind the digits.
bool read_tail(Decimal& number, const char* at, const char* end) {
  end = end_of_text(at, end);
  if (at == end) return true;
  return end - at == 1 ? read_suffix(number, *at)
                       : read_exponent(number, at, end);
}

// Powers of ten that are doubles, and the numbers up to 2^53: one operation
// on these is rounded once.
constexpr double k_powers[] = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                               1e8,  1e9,  1e10, 1e11, 1e12, 1e13, 1e14, 1e15,
                               1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};
constexpr std::int64_t k_max_power = std::size(k_powers) - 1;
constexpr std::uint64_t k_max_exact = std::uint64_t{1} << 53;

inline bool is_exact(const Decimal& number) {
  return number.count <= k_mantissa_digits && number.mantissa <= k_max_exact &&
         number.exponent >= -k_max_power && number.exponent <= k_max_power;
}

inline double exact_value(const Decimal& number) {
  const auto mantissa =
      static_cast<double>(static_cast<std::int64_t>(number.mantissa));
  return number.exponent < 0 ? mantissa / k_powers[-number.exponent]
                             : mantissa * k_powers[number.exponent];
}

// Digits that decide the rounding of a double: a number half-way between two
// has no more than 767, and whether a longer one is above it or below is told
// by any digit other than 0 behind.
constexpr std::size_t k_deciding_digits = 800;

// A decimal number as the standard library reads it: digits, of which the
// first is not 0, and an exponent.
class PlainDecimal {
 public:
  explicit PlainDecimal(const Decimal& number)
      : exponent(number.exponent + number.count) {
    bool has_more = false;
    for (const char* at = number.digits; at != number.end; ++at) {
      if (!zx_is_digit(*at)) continue;
      if (to == text && *at == '0')
        --exponent;
      else if (to < text + k_deciding_digits)
        *to++ = *at;
      else
        has_more |= *at != '0';
    }
    if (has_more) *to++ = '1';
  }

  // The nearest double.
  double value() {
    if (to == text || exponent < -k_beyond_doubles) return 0;
    if (exponent > k_beyond_doubles) return k_infinity;
    const std::int64_t of_last_digit = exponent - (to - text);
    *to++ = 'e';
    const char* const end =
        std::to_chars(to, std::end(text), of_last_digit).ptr;
    double nearest = 0;
    const auto result = std::from_chars(text, end, nearest);
    if (result.ec != std::errc::result_out_of_range) return nearest;
    return exponent > 0 ? k_infinity : 0;
  }

 private:
  // A power of ten that is beyond all doubles, as its inverse is.
  static constexpr std::int64_t k_beyond_doubles = 400;
  static constexpr double k_infinity = std::numeric_limits<double>::infinity();

  char text[k_deciding_digits + 32];
  char* to = text;
  std::int64_t exponent;  // with the decimal point ahead of the first digit
};

}  // namespace

double parse_double(zxChars text) {
  const char* const end = text.view().data() + text.view().size();
  const char* at = behind_space(text.view().data(), end);
  const bool is_negative = takes_minus(at, end);
  Decimal number;
  at = read_digits(number, at, end);
  if (number.count == 0 || !read_tail(number, at, end)) return 0;
  const double value =
      is_exact(number) ? exact_value(number) : PlainDecimal(number).value();
  return is_negative ? -value : value;
}
