// hvldec.cpp - the compact decimal.
// Tests: tests/hvl/hvldec_test.cpp.
#include "hvldec.h"

#include <bit>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <cstring>

#include "zxatsys.h"

namespace {

// The low bits of the forms that store four of them.
constexpr std::int32_t k_ten_thousandths = 1;
constexpr std::int32_t k_millionths = 5;
constexpr std::int32_t k_hundred_millionths = 9;
constexpr std::int32_t k_thousands = 13;
// The low two bits of hundredths and sixty-fourths.
constexpr std::int32_t k_hundredths = 3;

// The scales of the four-bit forms, by bits 2 and 3 of the word.
constexpr double k_scales[4] = {0.0001, 0.000001, 0.00000001, 1000};

bool is_integer_form(std::int32_t word) { return (word & 1) == 0; }
bool is_hundredths_form(std::int32_t word) { return (word & 3) == 3; }
bool is_whole(std::int32_t hundredths) { return hundredths % 100 == 0; }

std::int32_t four_bit_form(std::int32_t scaled, std::int32_t low_bits) {
  return scaled * 16 + low_bits;
}

// The value times the scale, rounded half away from zero.  The callers'
// limits keep it inside 32 bits.
std::int32_t scaled_by(double value, double scale) {
  return static_cast<std::int32_t>(value * scale +
                                   std::copysign(0.5, value));
}

// The word for a value of 5000000 and more.
std::int32_t large_word(double value) {
  constexpr double k_integer_limit = 1000000000;
  constexpr double k_limit = 100000000000;
  constexpr double k_largest = 99999999000;
  if (std::fabs(value) <= k_integer_limit) return scaled_by(value, 1) * 2;
  if (std::fabs(value) >= k_limit) value = std::copysign(k_largest, value);
  return four_bit_form(scaled_by(value, 0.001), k_thousands);
}

// A form that is fine enough for values up to some size.
struct FineForm {
  double limit;
  bool limit_included;
  double scale;
  std::int32_t low_bits;
};
constexpr FineForm k_fine_forms[] = {
    {1.34, false, 100000000, k_hundred_millionths},
    {134, false, 1000000, k_millionths},
    {13420, true, 10000, k_ten_thousandths},
};

// The word for a value below 5000000 that is not whole: the first form that
// is not too fine, which its last two digits tell.
std::int32_t fraction_word(double value) {
  const double size = std::fabs(value);
  for (const FineForm& form : k_fine_forms) {
    const bool fits = size < form.limit ||
                      (form.limit_included && size == form.limit);
    if (!fits) continue;
    const std::int32_t scaled = scaled_by(value, form.scale);
    if (!is_whole(scaled)) return four_bit_form(scaled, form.low_bits);
  }
  const std::int32_t hundredths = scaled_by(value, 100);
  return is_whole(hundredths) ? hundredths / 100 * 2
                              : hundredths * 4 + k_hundredths;
}

std::int32_t word_for(double value) {
  constexpr double k_large = 5000000;
  if (std::isnan(value)) return 0;
  if (std::fabs(value) >= k_large) return large_word(value);
  const auto whole = static_cast<std::int32_t>(value);
  return whole == value ? whole * 2 : fraction_word(value);
}

}  // namespace

double HvlDecimal::to_double() const {
  const std::int32_t w = word();
  if (is_integer_form(w)) return w >> 1;
  if (!is_hundredths_form(w)) return (w >> 4) * k_scales[(w >> 2) & 3];
  const double value = (w >> 2) * 0.01;
  return is_whole(w >> 2) ? value * 0.015625 : value;
}

void HvlDecimal::set_double(double value) { bits = word_for(value); }

void HvlDecimal::set_sixty_fourths(std::int32_t whole,
                                   std::int32_t sixty_fourths) {
  constexpr std::int64_t k_limit = 80000;
  const bool one_sign = (whole <= 0 || sixty_fourths >= 0) &&
                        (whole >= 0 || sixty_fourths <= 0);
  if (!ZX_ASSERT(sixty_fourths >= -63 && sixty_fourths <= 63) ||
      !ZX_ASSERT(one_sign))
    return;
  if (std::llabs(whole) >= k_limit)
    set_double(whole + sixty_fourths / 64.0);
  else
    bits = (whole * 64 + sixty_fourths) * 100 * 4 + k_hundredths;
}

bool HvlDecimal::get_sixty_fourths(std::int32_t& whole,
                                   std::int32_t& sixty_fourths) const {
  if (!is_sixty_fourths()) return false;
  const std::int32_t q = (word() >> 2) / 100;
  whole = q < 0 ? -(-q >> 6) : q >> 6;
  sixty_fourths = q < 0 ? -(-q & 63) : q & 63;
  return true;
}

void HvlDecimal::set_small_int(std::int32_t value) {
  if (!ZX_ASSERT(value >= -9999 && value <= 9999)) return;
  bits = four_bit_form(value * 10000, k_ten_thousandths);
}

bool HvlDecimal::is_small_int() const {
  const std::int32_t w = word();
  return (w & 15) == k_ten_thousandths && (w >> 4) % 10000 == 0;
}

bool HvlDecimal::is_sixty_fourths() const {
  const std::int32_t w = word();
  return is_hundredths_form(w) && is_whole(w >> 2);
}

// ---- text

namespace {

// A number as its decimal digits: digits * 10^-places.
struct Digits {
  std::int64_t digits;
  int places;  // 0, 2, 4, 6 or 8
};

Digits digits_of(std::int32_t word) {
  if (is_integer_form(word)) return {word >> 1, 0};
  if (is_hundredths_form(word)) {
    const std::int32_t hundredths = word >> 2;
    if (!is_whole(hundredths)) return {hundredths, 2};
    return {std::int64_t{hundredths / 100} * 15625, 6};
  }
  constexpr int k_places[4] = {4, 6, 8, 0};
  const int scale = (word >> 2) & 3;
  const std::int64_t digits = word >> 4;
  return {scale == 3 ? digits * 1000 : digits, k_places[scale]};
}

char* write_unsigned(char* out, std::uint64_t number) {
  return std::to_chars(out, out + HvlDecimal::k_max_text, number).ptr;
}

constexpr std::uint32_t k_powers[9] = {1,      10,      100,
                                       1000,   10000,   100000,
                                       1000000, 10000000, 100000000};
constexpr int k_fraction_digits = 8;

// Writes a fraction of 8 digits behind a point and returns the end without
// its trailing zeros; a fraction of 0 leaves nothing, not even the point.
char* write_fraction(char* out, std::uint32_t fraction) {
  if (fraction == 0) return out;
  *out = '.';
  for (int i = k_fraction_digits; i > 0; --i) {
    out[i] = static_cast<char>('0' + fraction % 10);
    fraction /= 10;
  }
  char* end = out + k_fraction_digits + 1;
  while (end[-1] == '0') --end;
  return end;
}

// A number below 0.0001: its digits with a point behind the first, and an
// exponent of three digits.
char* write_exponent_form(char* out, std::uint64_t digits, int places) {
  char* end = write_unsigned(out + 1, digits);
  const int exponent = places - static_cast<int>(end - out - 2);
  while (end[-1] == '0') --end;
  out[0] = out[1];
  out[1] = '.';
  if (end == out + 2) end = out + 1;
  std::memcpy(end, "e-00", 4);
  end[4] = static_cast<char>('0' + exponent);
  return end + 5;
}

}  // namespace

char* HvlDecimal::write_text(char* out) const {
  const auto [signed_digits, places] = digits_of(word());
  if (signed_digits < 0) *out++ = '-';
  const auto digits = static_cast<std::uint64_t>(std::llabs(signed_digits));
  const std::uint32_t unit = k_powers[places];
  constexpr std::uint64_t k_plain_from = 10000;  // 0.0001 is the last plain
  if (digits != 0 && digits * k_plain_from < unit)
    return write_exponent_form(out, digits, places);
  out = write_unsigned(out, digits / unit);
  const auto fraction = static_cast<std::uint32_t>(digits % unit);
  return write_fraction(out, fraction *
                                 k_powers[k_fraction_digits - places]);
}
