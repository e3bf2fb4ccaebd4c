// zxsfmt_number.cpp - the text of doubles.
//
// The digits come from std::to_chars, which is exact, rounds ties to even
// and knows no locale.  Two things are added: exponents have three digits at
// least, and exact ties go away from zero.
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <cstring>

#include "zxsfmt.h"

namespace {

constexpr int k_digits = 15;

// Room for a sign, 17 digits, a point and an exponent.
constexpr std::size_t k_room = 40;

struct NumberText {
  char bytes[k_room];
  std::size_t length = 0;

  void set_end(const char* end) {
    length = static_cast<std::size_t>(end - bytes);
  }
};

NumberText formatted(double number, std::chars_format format, int precision) {
  NumberText text;
  const auto result =
      std::to_chars(text.bytes, text.bytes + k_room, number, format, precision);
  text.set_end(result.ptr);
  return text;
}

// The number that lies exactly half-way between two texts of 15 digits is
// one of 16 digits that ends in 5.  Away from zero means: the text of the
// next double outwards.
double nudged_off_tie(double number) {
  const NumberText longer =
      formatted(number, std::chars_format::scientific, k_digits);
  const char* exponent =
      static_cast<const char*>(std::memchr(longer.bytes, 'e', longer.length));
  if (exponent == nullptr || exponent[-1] != '5') return number;

  // The 16 digits are the number itself, and not only near it, if none
  // follow; a double with a longer expansion shows that in 40 more digits or
  // is no tie of this size at all.
  constexpr int k_more = k_digits + 40;
  char exact[k_more + 16];
  const auto end = std::to_chars(exact, exact + sizeof exact, number,
                                 std::chars_format::scientific, k_more)
                       .ptr;
  const char* tail = exact + (exponent - longer.bytes);
  for (; tail < end && *tail != 'e'; ++tail)
    if (*tail != '0') return number;
  return std::nextafter(number, std::copysign(HUGE_VAL, number));
}

// Widens an exponent of two digits to three.
void widen_exponent(NumberText& text) {
  char* exponent =
      static_cast<char*>(std::memchr(text.bytes, 'e', text.length));
  if (exponent == nullptr) return;
  char* digits = exponent + 2;  // behind the sign, which is always there
  const std::size_t count =
      static_cast<std::size_t>(text.bytes + text.length - digits);
  if (count >= 3) return;
  std::memmove(digits + 1, digits, count);
  *digits = '0';
  ++text.length;
}

}  // namespace

void append_number(zxStr& out, double number) {
  if (std::isnan(number)) {
    out.append("nan", 3);
    return;
  }
  NumberText text;
  if (std::isinf(number)) {
    text = formatted(number, std::chars_format::general, k_digits);
  } else {
    text =
        formatted(nudged_off_tie(number), std::chars_format::general, k_digits);
    widen_exponent(text);
  }
  out.append(text.bytes, static_cast<std::int32_t>(text.length));
}
