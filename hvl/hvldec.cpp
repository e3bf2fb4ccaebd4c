// hvldec.cpp - the compact decimal.
// Tests: tests/hvl/hvldec_test.cpp.
#include "hvldec.h"

#include <array>
#include <bit>
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
  return static_cast<std::int32_t>(value * scale + std::copysign(0.5, value));
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
    const bool fits =
        size < form.limit || (form.limit_included && size == form.limit);
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
  const bool one_sign =
      (whole <= 0 || sixty_fourths >= 0) && (whole >= 0 || sixty_fourths <= 0);
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
//
// Beside the test for the integer form, which a column of a table keeps from
// record to record, no branch depends on the number, but for rare ones: a
// processor could not foresee how the digits of numbers fall.

namespace {

constexpr std::uint32_t k_unit = 100000000;  // 10^8, the finest scale

// The size of a number apart from its sign.
std::uint32_t size_of(std::int32_t number) {
  const auto bits = static_cast<std::uint32_t>(number);
  return number < 0 ? 0U - bits : bits;
}

// How a word that is no integer turns into units of 10^-8: shift, then
// multiply.
struct UnitForm {
  std::uint8_t shift;
  std::uint64_t factor;
};

constexpr UnitForm unit_form(std::int32_t low_bits, bool whole) {
  switch (low_bits) {
    case k_ten_thousandths:
      return {4, 10000};
    case k_millionths:
      return {4, 100};
    case k_hundred_millionths:
      return {4, 1};
    case k_thousands:
      return {4, std::uint64_t{1000} * k_unit};
    // Whole hundredths are 100 times a number of sixty-fourths.
    default:
      return {2, whole ? k_unit / 6400 : k_unit / 100};
  }
}

// By bits 1 to 3 of the word, and 8 more if word >> 2 is a multiple of 100.
constexpr auto make_unit_forms() {
  std::array<UnitForm, 16> forms{};
  for (int i = 0; i < 16; ++i)
    forms[static_cast<std::size_t>(i)] = unit_form(i % 8 * 2 + 1, i >= 8);
  return forms;
}
constexpr auto k_unit_forms = make_unit_forms();

// The size of a number in units of 10^-8; at most 1.35e19, for thousands.
std::uint64_t units_of(std::int32_t word) {
  const int index = (word >> 1 & 7) + 8 * is_whole(word >> 2);
  const UnitForm& form = k_unit_forms[static_cast<std::size_t>(index)];
  return size_of(word >> form.shift) * form.factor;
}

// The eight decimal digits of a number below 10^8, one in each byte, the
// first in the lowest: halves of four, pairs of two, then single digits, all
// parts of a step at once.
inline std::uint64_t eight_digits(std::uint32_t number) {
  const std::uint64_t fours = number / 10000 | std::uint64_t{number % 10000}
                                                   << 32;
  const std::uint64_t hundreds = (fours * 10486 >> 20) & 0x7F0000007F;
  const std::uint64_t pairs = ((fours - 100 * hundreds) << 16) + hundreds;
  const std::uint64_t tens = (pairs * 103 >> 10) & 0x000F000F000F000F;
  return ((pairs - 10 * tens) << 8) + tens;
}

constexpr std::uint64_t k_ascii_zeros = 0x3030303030303030;

void put_eight(char* out, std::uint64_t digits) {
  static_assert(std::endian::native == std::endian::little);
  const std::uint64_t text = digits | k_ascii_zeros;
  std::memcpy(out, &text, sizeof text);
}

// Writes a number below 10^8 without leading zeros.
char* write_eight(char* out, std::uint32_t number) {
  const std::uint64_t digits = eight_digits(number);
  // A bit set in the last byte keeps one digit for 0.
  const int leading = std::countr_zero(digits | std::uint64_t{1} << 56) / 8;
  put_eight(out, digits >> 8 * leading);
  return out + 8 - leading;
}

// Writes a whole number below 10^12.
char* write_whole(char* out, std::uint64_t number) {
  if (number < k_unit)
    return write_eight(out, static_cast<std::uint32_t>(number));
  out = write_eight(out, static_cast<std::uint32_t>(number / k_unit));
  put_eight(out, eight_digits(static_cast<std::uint32_t>(number % k_unit)));
  return out + 8;
}

// Writes a fraction of eight digits behind a point, without its trailing
// zeros; a fraction of 0 takes no room.
char* write_fraction(char* out, std::uint32_t fraction) {
  const std::uint64_t digits = eight_digits(fraction);
  out[0] = '.';
  put_eight(out + 1, digits);
  const int length = 8 - std::countl_zero(digits | 1) / 8;
  return fraction == 0 ? out : out + 1 + length;
}

// Writes a number below 0.0001: its digits with a point behind the first,
// and an exponent of three digits.
char* write_exponent_form(char* out, std::uint32_t units) {
  char* end = write_eight(out + 1, units);
  const int exponent = 8 - static_cast<int>(end - out - 2);
  while (end[-1] == '0') --end;
  out[0] = out[1];
  out[1] = '.';
  if (end == out + 2) end = out + 1;
  std::memcpy(end, "e-00", 4);
  end[4] = static_cast<char>('0' + exponent);
  return end + 5;
}

char* write_sign(char* out, bool negative) {
  out[0] = '-';
  return out + negative;
}

char* write_integer(char* out, std::int32_t number) {
  return write_whole(write_sign(out, number < 0), size_of(number));
}

char* write_scaled(char* out, std::int32_t word) {
  constexpr std::uint64_t k_plain_from = k_unit / 10000;
  const std::uint64_t units = units_of(word);
  out = write_sign(out, word < 0 && units != 0);
  if (units < k_plain_from && units != 0) [[unlikely]]
    return write_exponent_form(out, static_cast<std::uint32_t>(units));
  out = write_whole(out, units / k_unit);
  return write_fraction(out, static_cast<std::uint32_t>(units % k_unit));
}

}  // namespace

char* HvlDecimal::write_text(char* out) const {
  const std::int32_t w = word();
  return is_integer_form(w) ? write_integer(out, w >> 1) : write_scaled(out, w);
}
