// number_model.h - the texts of numbers a second time, for the tests: slow,
// obvious, written from the rules alone.
//
// It shares nothing with zxlib/zxsfmt*.cpp and asks no run time for a digit:
// a double is taken apart into its bits and written out in full, by long
// multiplication; then it is rounded as people do on paper, and laid out.
#ifndef NUMBER_MODEL_H
#define NUMBER_MODEL_H

#include <algorithm>
#include <bit>
#include <cstdint>
#include <string>
#include <vector>

namespace number_model {

// ------------------------------------------------------ the exact digits --

// digits[0].digits[1]digits[2]... x 10^exponent; the first digit is not 0,
// but for zero, which is "0" x 10^0.
struct Decimal {
  std::string digits;
  int exponent;
};

// A whole number of any size, its lowest nine decimal digits first.
using Whole = std::vector<std::uint32_t>;
inline constexpr std::uint32_t k_billion = 1'000'000'000;

inline void multiply(Whole& number, std::uint32_t by) {
  std::uint64_t carry = 0;
  for (std::uint32_t& part : number) {
    carry += std::uint64_t{part} * by;
    part = static_cast<std::uint32_t>(carry % k_billion);
    carry /= k_billion;
  }
  for (; carry != 0; carry /= k_billion)
    number.push_back(static_cast<std::uint32_t>(carry % k_billion));
}

// number x base^power, where base^step still has 32 bits.
inline void multiply_by_power(Whole& number, std::uint32_t base, int power,
                              int step) {
  for (; power > 0; power -= step) {
    std::uint32_t factor = 1;
    for (int i = 0; i < std::min(power, step); ++i) factor *= base;
    multiply(number, factor);
  }
}

inline std::string digits_of(const Whole& number) {
  std::string text;
  for (std::size_t i = number.size(); i-- > 0;) {
    const std::string part = std::to_string(number[i]);
    if (!text.empty()) text.append(9 - part.size(), '0');
    text += part;
  }
  return text;
}

inline Whole whole_of(std::uint64_t number) {
  Whole parts;
  for (; number != 0; number /= k_billion)
    parts.push_back(static_cast<std::uint32_t>(number % k_billion));
  return parts;
}

inline bool is_negative(double number) {
  return std::bit_cast<std::uint64_t>(number) >> 63 != 0;
}
inline int exponent_bits(double number) {
  return static_cast<int>(std::bit_cast<std::uint64_t>(number) >> 52 & 0x7FF);
}
inline std::uint64_t mantissa_bits(double number) {
  return std::bit_cast<std::uint64_t>(number) & ((std::uint64_t{1} << 52) - 1);
}

// All digits of a finite double, without its sign.
inline Decimal exact(double number) {
  int power = exponent_bits(number);
  std::uint64_t mantissa = mantissa_bits(number);
  if (power != 0) mantissa |= std::uint64_t{1} << 52;
  if (mantissa == 0) return {"0", 0};
  power = std::max(power, 1) - 1075;  // number = mantissa x 2^power
  for (; power < 0 && mantissa % 2 == 0; mantissa /= 2) ++power;

  Whole whole = whole_of(mantissa);
  if (power >= 0) multiply_by_power(whole, 2, power, 31);
  // mantissa / 2^n = mantissa x 5^n / 10^n
  if (power < 0) multiply_by_power(whole, 5, -power, 13);
  std::string digits = digits_of(whole);
  const int exponent = static_cast<int>(digits.size()) - 1 + std::min(power, 0);
  return {std::move(digits), exponent};
}

// -------------------------------------------------------------- rounding --

// The first `count` digits, none if it is below 1; half goes up, away from
// zero.
inline Decimal rounded(const Decimal& number, int count) {
  if (count < 0) return {"0", 0};
  const auto kept = static_cast<std::size_t>(count);
  if (kept >= number.digits.size()) return number;
  const bool up = number.digits[kept] >= '5';
  std::string digits = number.digits.substr(0, kept);
  if (!up)
    return digits.empty() ? Decimal{"0", 0} : Decimal{digits, number.exponent};
  while (!digits.empty() && digits.back() == '9') digits.pop_back();
  if (digits.empty()) return {"1", number.exponent + 1};
  ++digits.back();
  return {std::move(digits), number.exponent};
}

// ---------------------------------------------------------------- layout --

// The form of a directive such as "%+-10.3g".
struct Form {
  std::string flags = {};
  int width = 0;
  int precision = -1;  // none
  char letter = 'g';

  bool has(char flag) const { return flags.find(flag) != flags.npos; }
};

// The digit of 10^power.
inline char digit_at(const Decimal& number, int power) {
  const int i = number.exponent - power;
  return i < 0 || i >= static_cast<int>(number.digits.size())
             ? '0'
             : number.digits[static_cast<std::size_t>(i)];
}

inline std::string fixed(const Decimal& exact_number, int decimals,
                         bool keeps_point) {
  const Decimal number =
      rounded(exact_number, exact_number.exponent + 1 + decimals);
  std::string text;
  for (int power = std::max(number.exponent, 0); power >= 0; --power)
    text += digit_at(number, power);
  if (decimals > 0 || keeps_point) text += '.';
  for (int power = -1; power >= -decimals; --power)
    text += digit_at(number, power);
  return text;
}

// At least three digits of exponent.
inline std::string scientific(const Decimal& exact_number, int decimals,
                              bool keeps_point) {
  const Decimal number = rounded(exact_number, 1 + decimals);
  std::string text = {number.digits[0]};
  if (decimals > 0 || keeps_point) text += '.';
  for (int i = 1; i <= decimals; ++i)
    text += digit_at(number, number.exponent - i);
  const std::string power = std::to_string(std::abs(number.exponent));
  text += number.exponent < 0 ? "e-" : "e+";
  if (power.size() < 3) text.append(3 - power.size(), '0');
  return text + power;
}

// Takes zeros off the end of a fraction, and the point that nothing follows.
inline std::string without_zeros(std::string text) {
  const std::size_t tail = std::min(text.find('e'), text.size());
  if (text.find('.') == text.npos) return text;
  std::size_t end = tail;
  while (text[end - 1] == '0') --end;
  if (text[end - 1] == '.') --end;
  return text.erase(end, tail - end);
}

inline std::string general(const Decimal& number, int digits,
                           bool keeps_zeros) {
  digits = std::max(digits, 1);
  const int exponent = rounded(number, digits).exponent;
  std::string text = exponent < -4 || exponent >= digits
                         ? scientific(number, digits - 1, keeps_zeros)
                         : fixed(number, digits - 1 - exponent, keeps_zeros);
  return keeps_zeros ? text : without_zeros(std::move(text));
}

// `sign` and what follows it, brought to the width.
inline std::string padded(const std::string& sign, const std::string& text,
                          const Form& form, bool takes_zeros) {
  const auto length = static_cast<int>(sign.size() + text.size());
  const auto missing =
      static_cast<std::size_t>(std::max(form.width - length, 0));
  if (form.has('-')) return sign + text + std::string(missing, ' ');
  if (form.has('0') && takes_zeros)
    return sign + std::string(missing, '0') + text;
  return std::string(missing, ' ') + sign + text;
}

inline std::string sign_of(bool negative, const Form& form) {
  if (negative) return "-";
  if (form.has('+')) return "+";
  return form.has(' ') ? " " : "";
}

// A finite double under e, E, f, g or G.
inline std::string text_of(double number, const Form& form) {
  const Decimal decimal = exact(number);
  const int precision = form.precision < 0 ? 6 : form.precision;
  std::string text;
  switch (form.letter) {
    case 'f':
      text = fixed(decimal, precision, form.has('#'));
      break;
    case 'e':
    case 'E':
      text = scientific(decimal, precision, form.has('#'));
      break;
    default:
      text = general(decimal, precision, form.has('#'));
  }
  if (form.letter < 'a') std::replace(text.begin(), text.end(), 'e', 'E');
  return padded(sign_of(is_negative(number), form), text, form, true);
}

// The default form of any double.
inline std::string default_text(double number) {
  if (exponent_bits(number) == 0x7FF) {
    if (mantissa_bits(number) != 0) return "nan";
    return is_negative(number) ? "-inf" : "inf";
  }
  return text_of(number, {.precision = 15});
}

// -------------------------------------------------------------- integers --

inline std::string in_base(std::uint32_t number, unsigned base) {
  std::string text;
  for (; number != 0; number /= base)
    text.insert(text.begin(), "0123456789abcdef"[number % base]);
  return text;
}

// 32 bits under d, i, o, u, x or X.
inline std::string text_of(std::uint32_t bits, const Form& form) {
  const bool has_sign = form.letter == 'd' || form.letter == 'i';
  const bool negative = has_sign && bits >> 31 != 0;
  const bool is_octal = form.letter == 'o';
  const bool is_hex = form.letter == 'x' || form.letter == 'X';
  std::string text = in_base(negative ? 0 - bits : bits, is_octal ? 8
                                                         : is_hex ? 16
                                                                  : 10);
  const auto digits =
      static_cast<std::size_t>(form.precision < 0 ? 1 : form.precision);
  if (text.size() < digits) text.insert(0, digits - text.size(), '0');
  if (is_octal && form.has('#') && !text.starts_with('0')) text.insert(0, "0");

  std::string sign = has_sign ? sign_of(negative, form) : "";
  if (is_hex && form.has('#') && bits != 0) sign = "0x";
  text = padded(sign, text, form, form.precision < 0);
  if (form.letter == 'X')
    std::transform(text.begin(), text.end(), text.begin(), [](char c) {
      return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c;
    });
  return text;
}

}  // namespace number_model

#endif  // NUMBER_MODEL_H
