// hvldec.h - HvlDecimal, the compact decimal of the table records: one
// signed 32-bit word, little-endian, whose low bits tell the scale.
//
//   low bits   form                  value
//   ...0       integer               word >> 1
//   ..11       hundredths            (word >> 2) * 0.01, unless that is whole
//   ..11       sixty-fourths         (word >> 2) / 100 / 64, if (word >> 2) is
//                                    a multiple of 100
//   0001       ten-thousandths       (word >> 4) * 0.0001
//   0101       millionths            (word >> 4) * 0.000001
//   1001       hundred-millionths    (word >> 4) * 0.00000001
//   1101       thousands             (word >> 4) * 1000
//
// Shifts are arithmetic; the word 0 is the number 0.  The object is exactly
// its four bytes and needs no alignment, so it lies in records as it is.
#ifndef HVLDEC_H
#define HVLDEC_H

#include <cstdint>

#include "zxle.h"

class HvlDecimal {
 public:
  // The number 0.
  constexpr HvlDecimal() : bits(0) {}

  // The number that a stored word spells; every word spells one.
  static constexpr HvlDecimal from_word(std::int32_t word) {
    HvlDecimal number;
    number.bits = word;
    return number;
  }
  constexpr std::int32_t word() const { return bits; }

  double to_double() const;

  // Takes the coarsest form that holds the value, rounded half away from
  // zero to the finest that its size allows: 8 digits behind the point below
  // 1.34, 6 below 134, 4 up to 13420, 2 below 5000000, none up to 1e9, then
  // thousands.  From 1e11 on the value is 99999999000.  NaN gives 0.
  void set_double(double value);

  // `whole` and `sixty_fourths` (-63 to 63) of one sign, or an assertion
  // fails and the number stays.  From 80000 on the value is stored as by
  // set_double().
  void set_sixty_fourths(std::int32_t whole, std::int32_t sixty_fourths);

  // The two parts, both of the number's sign; false, and nothing stored, in
  // every other form.
  bool get_sixty_fourths(std::int32_t& whole,
                         std::int32_t& sixty_fourths) const;

  // A whole number from -9999 to 9999 in the ten-thousandths form; outside,
  // an assertion fails and the number stays.
  void set_small_int(std::int32_t value);

  bool is_small_int() const;
  bool is_sixty_fourths() const;

  // Writes the number's text, without a NUL, and returns its end: the text
  // that to_double() has with up to 15 significant digits, as in "12.5",
  // "-1000", "1.25e-006".  It is made from the word's digits, with no
  // floating point on the way.  `out` has room for k_max_text bytes; bytes
  // behind the text are overwritten.
  static constexpr int k_max_text = 32;
  char* write_text(char* out) const;

  friend bool operator==(const HvlDecimal& a, const HvlDecimal& b) {
    return a.word() == b.word();
  }

 private:
  zxLe<std::int32_t> bits;
};
static_assert(sizeof(HvlDecimal) == 4 && alignof(HvlDecimal) == 1);

#endif  // HVLDEC_H
