// zxdate.h - zxDate, a calendar date as a signed 16-bit number of days since
// 1970-01-01, which is what the data files store.
//
// The calendar runs from 1970 to 2057 and takes every fourth year as a leap
// year, which is exact within that range.
#ifndef ZXDATE_H
#define ZXDATE_H

#include <cstdint>

#include "zxstr.h"

class zxDate {
 public:
  // 1970-01-01.
  constexpr zxDate() = default;

  // The date of a stored day count.  Any count is taken: one outside the
  // calendar fails when its fields or its text are asked for.
  static constexpr zxDate from_stored(std::int16_t days_since_1970) {
    zxDate date;
    date.count = days_since_1970;
    return date;
  }

  constexpr std::int16_t days() const { return count; }

  // The year in full, the month from 1 and the day from 1.  A date outside
  // the calendar fails an assertion, and the fields stay as they are; the
  // result tells.
  bool get_full(std::int32_t& year, std::int32_t& month,
                std::int32_t& day) const;

  // "dd-mm-yy", as in "25-02-09"; empty for a date outside the calendar,
  // behind a dropped assertion.
  zxStr to_text() const;

  // The same eight bytes, without a NUL, into a caller's buffer; false, and
  // nothing written, where to_text() is empty.
  static constexpr std::int32_t k_text_length = 8;
  bool write_text(char* out) const;

  friend constexpr bool operator==(zxDate, zxDate) = default;

 private:
  std::int16_t count = 0;
};

#endif  // ZXDATE_H
