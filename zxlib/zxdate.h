// zxdate.h - zxDate, a calendar date as a signed 16-bit number of days since
// 1970-01-01, which is what the data files store.
//
// The calendar runs from 1970 to 2057 and takes every fourth year as a leap
// year, which is exact within that range.  Day counts are held to a range
// that ends a year earlier: set_days() and add_days() take 0 to k_last_days
// (2056-12-31), while everything that goes by year, month and day reaches
// 2057-12-31 (32141).
//
// Years can be given with two digits: 70 to 99 belong to the century of 1900,
// 0 to 57 to that of 2000, and 58 to 69 to none.
//
// These rules are meant, and programs rely on them:
//   - set() does not look at the length of the month, so 31 February is taken
//     and lands in March; so does add_months(), which keeps the day whatever
//     the new month is.  set_month() and set_year() lower the day.
//   - parse() tests the length of the month, and takes the year 100 for 2000.
//   - any stored count is a date; one outside the calendar fails when its
//     fields or its text are asked for.
//
// After a failure that was dropped a setter leaves the date as it was, and a
// question gets 0, an empty text or, for a date, this one.
#ifndef ZXDATE_H
#define ZXDATE_H

#include <compare>
#include <cstdint>

#include "zxstr.h"

class zxTime;

namespace zxdate_detail {
// Makes any stored day count a number of days since a Sunday, above 0.
inline constexpr std::int32_t k_days_to_sunday = 4682 * 7 + 4;
}  // namespace zxdate_detail

class zxDate {
 public:
  // The highest day count that set_days() and add_days() take, 2056-12-31.
  static constexpr std::int32_t k_last_days = 31776;

  // 1970-01-01.
  constexpr zxDate() = default;

  // The date of a stored day count.  Any count is taken: one outside the
  // calendar fails when its fields or its text are asked for.
  static constexpr zxDate from_stored(std::int16_t days_since_1970) {
    zxDate date;
    date.count = days_since_1970;
    return date;
  }

  // Today's date on the local clock.
  static zxDate today();

  // ---- setting
  // A year of two digits or from 1970 to 2057, a month from 1 to 12, a day
  // from 1 to 31; anything else is message 1801.
  void set(std::int32_t year, std::int32_t month, std::int32_t day);

  // A count outside of 0 to k_last_days fails an assertion.
  void set_days(std::int32_t days_since_1970);

  // The local date of a moment, in seconds since 1970-01-01 UTC.  One that
  // has no local time (see local_fields() in zxtime.h) is dated 1900, hence
  // message 1801.
  void set_from_time_t(std::int64_t moment);

  // The date of a time; of the null time, which has none, message 1801.
  void set_from_time(zxTime time);

  // Reads "day/month/year", with "." or "-" in the place of both "/" as well;
  // true if that was a date.  If not, this one stays.  Null text is none.
  //
  // What stands behind the year is not looked at, and missing digits count
  // as 0, so that "1/2/" is in 2000.  The year may have white space and a
  // sign ahead of it; ahead of the others they stand where a separator must.
  bool parse(const char* text);
  bool parse(const zxStr& text) { return parse(text.c_str()); }

  // ---- fields: a date outside the calendar fails an assertion
  constexpr std::int16_t days() const { return count; }

  // The year in full, the month from 1 and the day from 1.  The result tells
  // whether there are any; if not, the variables stay as they are.
  bool get_full(std::int32_t& year, std::int32_t& month,
                std::int32_t& day) const;

  // The same with the last two digits of the year.
  bool get(std::int32_t& year, std::int32_t& month, std::int32_t& day) const;

  std::int32_t year() const;  // two digits
  std::int32_t full_year() const;
  std::int32_t month() const;
  std::int32_t day() const;

  // The number of days of its month.
  std::int32_t days_in_month() const;

  // 0 for Sunday to 6 for Saturday.  Every count has one.
  constexpr std::int32_t day_of_week() const {
    return (count + zxdate_detail::k_days_to_sunday) % 7;
  }

  // ---- reckoning
  // The last day of its month.
  zxDate end_of_month() const;

  // Goes on by n days; a result outside of 0 to k_last_days fails an
  // assertion.
  void add_days(std::int32_t n);

  // Goes on by n months, the day of the month staying: 31 January and one
  // month are 3 March, or 2 March in a leap year.  The new date goes through
  // set(); so a year outside the calendar is message 1801, unless its number
  // is a two-digit year.
  void add_months(std::int32_t n);

  // A day from 1 to days_in_month(), a month from 1 to 12; anything else
  // fails an assertion.  The year as in set().
  void set_day(std::int32_t day);
  void set_month(std::int32_t month);
  void set_year(std::int32_t year);

  // How many days from this one up to `to`, both of them included, are a
  // Friday or a Saturday; 0 if `to` is earlier.
  std::int32_t count_weekend_days(zxDate to) const;

  // ---- text
  // "dd-mm-yy", as in "25-02-09".
  zxStr to_text() const;

  // "dd-mm-yyyy".
  zxStr to_text_full() const;

  // The eight bytes of to_text(), without a NUL, into a caller's buffer;
  // false, and nothing written, where that is empty.
  static constexpr std::int32_t k_text_length = 8;
  bool write_text(char* out) const;

  // By the count.
  friend constexpr bool operator==(zxDate, zxDate) = default;
  friend constexpr auto operator<=>(zxDate, zxDate) = default;

 private:
  std::int16_t count = 0;
};
static_assert(sizeof(zxDate) == 2);

// What zxTime goes by as well.
namespace zxdate_detail {

inline constexpr std::int32_t k_first_year = 1970;

constexpr bool is_between(std::int32_t low, std::int32_t value,
                          std::int32_t high) {
  return value >= low && value <= high;
}

struct DateFields {
  std::int32_t year;
  std::int32_t month;
  std::int32_t day;
};

// The year that a parser takes a number for: two digits as above, 100 too.
std::int32_t parsed_year(std::int32_t year);

// The number of days of a month from 1 to 12.
std::int32_t days_of_month(std::int32_t year, std::int32_t month);

// True if the year has this month, from 1, and the month this day.
bool is_day(const DateFields& date);

// Reads the whole number at a place as std::atoi() does, white space and a
// sign ahead of it included; the place moves on over digits alone.  False,
// and the place stays, for a number whose digits exceed 31 bits.
bool read_number(const char*& at, std::int32_t& number);

// Reads day, month and year, not tested yet but for the window of years.
// The place behind the year; null if numbers and separators are wrong.
const char* read_date(const char* text, DateFields& date);

// How many of the days from `first` to `last`, counted as in a zxDate, are a
// Friday or a Saturday.
std::int32_t weekend_days(std::int32_t first, std::int32_t last);

}  // namespace zxdate_detail

#endif  // ZXDATE_H
