// zxtime.h - zxTime, a point in time as a signed 32-bit number of seconds
// since 1970-01-01 00:00 on the local clock; the text forms of moments.
//
// A time holds what the wall clock shows, so its fields need no zone: they
// are those of the seconds, from 1970 to 2038.  The null time stands for no
// time at all.  Seconds below 86400, the first day of 1970, are no time
// either, and no operation gives one that has them; such a stored number
// fails an assertion when its fields are asked for, unless it is above 0.
//
// A moment is a number of seconds since 1970-01-01 00:00 UTC, as the C
// library's time_t.  Times come from moments and become such by the offset of
// the local zone's present standard time; daylight saving does not enter.  A
// moment beyond 32 bits is none there, and counts as -1.
//
// These rules are meant, and programs rely on them:
//   - minutes given as a number are not tested: 75 of them are an hour and a
//     quarter;
//   - years of two digits are those of zxdate.h, with 100 for 2000, and the
//     calendar ends within 2038;
//   - what local_fields() and format_time_t() show in summer is ahead of a
//     zxTime of the same moment, where clocks are changed.
//
// After a failure that was dropped a setter leaves the time as it was (set()
// leaves what try_set() does), and a question gets 0, an empty text or, for a
// time, this one.
#ifndef ZXTIME_H
#define ZXTIME_H

#include <compare>
#include <cstdint>
#include <ctime>
#include <optional>

#include "zxdate.h"
#include "zxstr.h"

class zxTime {
 public:
  static constexpr std::int32_t k_null = INT32_MIN;
  static constexpr std::int32_t k_first = 86400;  // 1970-01-02 00:00

  // The null time.
  constexpr zxTime() = default;

  // The time of a stored number.  Any number is taken.
  static constexpr zxTime from_stored(std::int32_t seconds) {
    zxTime time;
    time.count = seconds;
    return time;
  }

  // ---- setting
  // k_null, or seconds from k_first on; anything else fails an assertion.
  void set_raw(std::int32_t seconds);

  // The time of a moment.  False, and the null time, if its seconds are
  // below k_first or beyond 32 bits.
  bool set_time_t(std::int64_t moment);

  // A year of two digits or from 1970 to 2038, a day that the month has,
  // hours from 0 to 23, seconds from 0 to 59, and any number of minutes.
  // False, and the time stays, for anything else; false, and the null time,
  // for a time below k_first or beyond 32 bits.
  bool try_set(std::int32_t year, std::int32_t month, std::int32_t day,
               std::int32_t hour, std::int32_t minute, std::int32_t second);

  // The same; message 1803 with the detail 1 where that is false.
  void set(std::int32_t year, std::int32_t month, std::int32_t day,
           std::int32_t hour, std::int32_t minute, std::int32_t second);

  // Reads a date as zxDate::parse() and, if anything stands behind that, one
  // byte of white space and "hour:minute:second"; a time left out is 0:00.
  // The result, and what becomes of the time, are those of try_set(); a text
  // of another shape is false as well, and the time stays.  Null or empty
  // text is the null time, and true.
  //
  // What stands behind the second is not looked at, and missing digits count
  // as 0.  The second may have white space and a sign ahead of it, the hour
  // may not: a second blank behind the date is false.
  bool parse(const char* text);
  bool parse(const zxStr& text) { return parse(text.c_str()); }

  // ---- fields: all 0 for the null time
  constexpr std::int32_t secs() const { return count; }
  constexpr bool is_null() const { return count == k_null; }

  // The moment.  INT32_MIN for the null time; -1 for one beyond 32 bits.
  std::int64_t to_time_t() const;

  // The year in full, months and days from 1.
  void get(std::int32_t& year, std::int32_t& month, std::int32_t& day,
           std::int32_t& hour, std::int32_t& minute,
           std::int32_t& second) const;
  void get_date(std::int32_t& year, std::int32_t& month,
                std::int32_t& day) const;

  std::int32_t year() const;  // in full
  std::int32_t month() const;
  std::int32_t day() const;
  std::int32_t hour() const;
  std::int32_t minute() const;
  std::int32_t second() const;

  // 0 for Sunday to 6 for Saturday.
  std::int32_t day_of_week() const;

  // The number of days of its month.
  std::int32_t days_in_month() const;

  // ---- reckoning
  // The same time of day on the last day of its month; of the null time, the
  // null time.  A result beyond 32 bits, in 2038, fails an assertion.
  zxTime end_of_month() const;

  // Goes on by n days; the null time, and a result below k_first or beyond
  // 32 bits, fail an assertion.
  void add_days(std::int32_t n);

  // How many of the times from this one on, in steps of a day and not beyond
  // `to`, are on a Friday or a Saturday; so the day of `to` counts if its
  // time of day is not earlier.  0 if either is the null time.
  std::int32_t count_weekend_days(zxTime to) const;

  // ---- text: empty for the null time
  // A form of format_time_t(), with the fields of this time.
  zxStr format(std::int32_t index) const;

  // "dd-mm-yyyy hh:mm:ss".
  zxStr to_text() const;

  // By the seconds; the null time comes first.
  friend constexpr bool operator==(zxTime, zxTime) = default;
  friend constexpr auto operator<=>(zxTime, zxTime) = default;

 private:
  bool has_fields() const;
  std::int32_t time_of_day() const;
  zxDate date() const;

  std::int32_t count = k_null;
};
static_assert(sizeof(zxTime) == 4);

// The moment at which a day begins, by a clock without daylight saving; -1
// for one beyond 32 bits.  A date outside the calendar fails an assertion, and
// is -1 too.
std::int64_t start_of_day(zxDate date);

// What the local clock shows at a moment, daylight saving included.  A moment
// below 1 or beyond the year 3000 has no such thing: its fields are all 0,
// but for the day of the month, which is 1.
std::tm local_fields(std::int64_t moment);

// What the local clock shows at a moment, now if it is absent, in a form:
//   0  25-02-09 14:05:00    3  09/02/25 14:05:00
//   1  25-02-09             4  25-02-09 14:05
//   2  14:05:00             5  Feb-25 14:05
// A moment without local fields shows as "01-01-00 00:00:00".  Another index
// fails an assertion and gives an empty text.
zxStr format_time_t(std::optional<std::int64_t> moment, std::int32_t index);

// The same in a form of one's own, with the letters of strftime() in C89 (a A
// b B c d H I j m M p S U w W x X y Y Z %) and in English.  One with another
// letter, and a text of more than 79 bytes, give an empty text.  "%c" is
// "%m/%d/%y %H:%M:%S", "%x" and "%X" are its halves.
zxStr format_moment(std::int64_t moment, const char* form);

#endif  // ZXTIME_H
