// zxtime_test.cpp - times of the local clock: every day of the calendar
// against the standard library's, the null time and numbers that are no time,
// parsing and text forms, and zones east and west with daylight saving.  Here
// is also what dates have to do with the zone.
// Tests zxlib/zxtime.h, zxtime.cpp and parts of zxdate.cpp.
#include "zxtime.h"

#include <gtest/gtest.h>

#include <chrono>
#include <climits>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/target.h"
#include "kit/text.h"
#include "kit/ticks.h"
#include "kit/variables.h"
#include "zones.h"
#include "zxplat.h"

namespace {

constexpr std::int32_t k_day = 86400;
constexpr std::int32_t k_last_day = 24855;  // 2038-01-19
constexpr std::int32_t k_null = INT32_MIN;

// The numbers that are no time.
constexpr std::int32_t k_illegal[] = {INT32_MIN + 1, -86400, -1, 0};

// A time that no row of a test ends at: 1998-11-27 14:22:03.
constexpr std::int32_t k_other_time = 912'176'523;

// Seconds of days, at the edges of hours and minutes.
constexpr std::int32_t k_seconds[] = {
    0, 1, 59, 60, 3599, 3600, 43'199, 43'200, 45'296, 86'340, 86'399};

zxTime time_of(std::int32_t seconds) { return zxTime::from_stored(seconds); }

using kit::Clock;
using kit::InZone;
using kit::text_of;

struct Fields {
  std::int32_t year = -1;
  std::int32_t month = -2;
  std::int32_t day = -3;
  std::int32_t hour = -4;
  std::int32_t minute = -5;
  std::int32_t second = -6;

  friend bool operator==(const Fields&, const Fields&) = default;
};

std::string text_of(const Fields& f) {
  char text[80];
  std::snprintf(text, sizeof text, "%.2d-%.2d-%.4d %.2d:%.2d:%.2d",
                static_cast<int>(f.day), static_cast<int>(f.month),
                static_cast<int>(f.year), static_cast<int>(f.hour),
                static_cast<int>(f.minute), static_cast<int>(f.second));
  return text;
}

std::ostream& operator<<(std::ostream& out, const Fields& fields) {
  return out << text_of(fields);
}

Fields fields_of(zxTime time) {
  Fields f;
  time.get(f.year, f.month, f.day, f.hour, f.minute, f.second);
  return f;
}

// The standard library's calendar and clock.
Fields fields_at(std::int64_t seconds) {
  const std::chrono::sys_seconds time{std::chrono::seconds(seconds)};
  const auto day = std::chrono::floor<std::chrono::days>(time);
  const std::chrono::year_month_day date(day);
  const std::chrono::hh_mm_ss clock(time - day);
  return {static_cast<int>(date.year()),
          static_cast<std::int32_t>(static_cast<unsigned>(date.month())),
          static_cast<std::int32_t>(static_cast<unsigned>(date.day())),
          static_cast<std::int32_t>(clock.hours().count()),
          static_cast<std::int32_t>(clock.minutes().count()),
          static_cast<std::int32_t>(clock.seconds().count())};
}

// The seconds up to fields, of which hours, minutes and seconds may have any
// value; none if there is no such day.
std::optional<std::int64_t> seconds_of(const Fields& f) {
  const std::chrono::year_month_day date{
      std::chrono::year(f.year),
      std::chrono::month(static_cast<unsigned>(f.month)),
      std::chrono::day(static_cast<unsigned>(f.day))};
  if (f.month < 1 || f.day < 1 || !date.ok()) return {};
  const std::int64_t days =
      std::chrono::sys_days(date).time_since_epoch().count();
  return days * k_day + std::int64_t{f.hour} * 3600 +
         std::int64_t{f.minute} * 60 + f.second;
}

std::int32_t weekday_of(std::int64_t day) {
  const std::chrono::weekday weekday{
      std::chrono::sys_days(std::chrono::days(day))};
  return static_cast<std::int32_t>(weekday.c_encoding());
}

std::int32_t length_of_month(std::int32_t year, std::int32_t month) {
  const std::chrono::year_month_day_last last{
      std::chrono::year(year), std::chrono::month_day_last(std::chrono::month(
                                   static_cast<unsigned>(month)))};
  return static_cast<std::int32_t>(static_cast<unsigned>(last.day()));
}

constexpr char k_bad_time[] = "1803: settime: bad time (#) (1)";
constexpr char k_bad_time_line[] = "[1803-1803-1/E-0/E//]";

// ---- the number

TEST(zxtime, the_default_is_the_null_time) {
  EXPECT_EQ(zxTime().secs(), k_null);
  EXPECT_TRUE(zxTime().is_null());
  EXPECT_FALSE(time_of(0).is_null());
  EXPECT_EQ(static_cast<std::uint32_t>(zxTime::k_null), 0x80000000U);
  static_assert(zxTime().is_null());
}

TEST(zxtime, is_its_number_and_nothing_else) {
  static_assert(sizeof(zxTime) == 4);
  static_assert(zxTime::from_stored(-7).secs() == -7);
  static_assert(zxTime::from_stored(INT32_MAX).secs() == INT32_MAX);
}

TEST(zxtime, times_are_in_the_order_of_their_seconds) {
  const std::int32_t seconds[] = {k_null, -1, 0, k_day, INT32_MAX};
  for (const std::int32_t a : seconds) {
    for (const std::int32_t b : seconds) {
      EXPECT_EQ(time_of(a) < time_of(b), a < b);
      EXPECT_EQ(time_of(a) >= time_of(b), a >= b);
      EXPECT_EQ(time_of(a) == time_of(b), a == b);
    }
  }
}

TEST(zxtime, set_raw_takes_the_null_time_and_what_is_behind_the_first_day) {
  zxTime time;
  for (const std::int32_t seconds : {k_day, k_null, k_day + 1, INT32_MAX}) {
    time.set_raw(seconds);
    EXPECT_EQ(time.secs(), seconds);
  }
  for (const std::int32_t seconds :
       {k_day - 1, 1, 0, -1, INT32_MIN + 1, -k_day}) {
    SCOPED_TRACE(seconds);
    EXPECT_ASSERTION(time.set_raw(seconds), "zxtime");
    kit::with_failures_dropped([&] { time.set_raw(seconds); });
    EXPECT_EQ(time.secs(), INT32_MAX);
  }
}

// ---- fields

TEST(zxtime, every_field_of_every_day) {
  for (std::int32_t day = 0; day <= k_last_day; ++day) {
    for (const std::int32_t second : k_seconds) {
      const std::int64_t seconds = std::int64_t{day} * k_day + second;
      if (seconds == 0 || seconds > INT32_MAX) continue;
      const zxTime time = time_of(static_cast<std::int32_t>(seconds));
      const Fields expected = fields_at(seconds);
      ASSERT_EQ(fields_of(time), expected);
      ASSERT_EQ((Fields{time.year(), time.month(), time.day(), time.hour(),
                        time.minute(), time.second()}),
                expected);
      Fields date;
      time.get_date(date.year, date.month, date.day);
      ASSERT_EQ((Fields{date.year, date.month, date.day}),
                (Fields{expected.year, expected.month, expected.day}));
      ASSERT_EQ(time.day_of_week(), weekday_of(day));
      ASSERT_EQ(time.days_in_month(),
                length_of_month(expected.year, expected.month));
      ASSERT_EQ(text_of(time.to_text()), text_of(expected));
    }
  }
}

TEST(zxtime, fields_worked_out_by_hand) {
  EXPECT_EQ(text_of(time_of(1).to_text()), "01-01-1970 00:00:01");
  EXPECT_EQ(text_of(time_of(k_day).to_text()), "02-01-1970 00:00:00");
  EXPECT_EQ(text_of(time_of(k_other_time).to_text()), "27-11-1998 14:22:03");
  EXPECT_EQ(text_of(time_of(INT32_MAX).to_text()), "19-01-2038 03:14:07");
  EXPECT_EQ(time_of(k_day).day_of_week(), 5);
  EXPECT_EQ(time_of(k_other_time).day_of_week(), 5);
  EXPECT_EQ(time_of(k_other_time).year(), 1998);
}

TEST(zxtime, the_null_time_has_no_fields_and_no_text) {
  const zxTime null;
  EXPECT_EQ(fields_of(null), (Fields{0, 0, 0, 0, 0, 0}));
  Fields date;
  null.get_date(date.year, date.month, date.day);
  EXPECT_EQ(date, (Fields{0, 0, 0}));
  EXPECT_EQ(null.year(), 0);
  EXPECT_EQ(null.month(), 0);
  EXPECT_EQ(null.day(), 0);
  EXPECT_EQ(null.hour(), 0);
  EXPECT_EQ(null.minute(), 0);
  EXPECT_EQ(null.second(), 0);
  EXPECT_EQ(null.day_of_week(), 0);
  EXPECT_EQ(null.days_in_month(), 0);
  EXPECT_TRUE(null.end_of_month().is_null());
  EXPECT_EQ(text_of(null.to_text()), "");
  for (std::int32_t index = 0; index <= 5; ++index)
    EXPECT_EQ(text_of(null.format(index)), "");
}

TEST(zxtime, questions_to_a_number_that_is_no_time_fail) {
  for (const std::int32_t seconds : k_illegal) {
    SCOPED_TRACE(seconds);
    const zxTime time = time_of(seconds);
    Fields f;
    EXPECT_ASSERTION(
        time.get(f.year, f.month, f.day, f.hour, f.minute, f.second), "zxtime");
    EXPECT_ASSERTION(time.get_date(f.year, f.month, f.day), "zxtime");
    const std::vector<std::function<std::int32_t()>> questions = {
        [&] { return time.year(); },
        [&] { return time.month(); },
        [&] { return time.day(); },
        [&] { return time.hour(); },
        [&] { return time.minute(); },
        [&] { return time.second(); },
        [&] { return time.day_of_week(); },
        [&] { return time.days_in_month(); },
        [&] { return time.to_text().length(); },
        [&] { return time.format(0).length(); },
        [&] { return time.count_weekend_days(time_of(k_day)); },
    };
    for (const auto& question : questions) {
      EXPECT_ASSERTION(question(), "zxtime");
      kit::with_failures_dropped([&] { EXPECT_EQ(question(), 0); });
    }
    EXPECT_ASSERTION(time.end_of_month(), "zxtime");
    kit::with_failures_dropped([&] {
      EXPECT_EQ(time.end_of_month(), time);
      EXPECT_EQ(fields_of(time), (Fields{0, 0, 0, 0, 0, 0}));
    });
  }
}

// ---- reckoning

TEST(zxtime, the_end_of_the_month_keeps_the_time_of_day) {
  for (std::int32_t day = 1; day < k_last_day - 18; ++day) {
    for (const std::int32_t second : k_seconds) {
      const std::int32_t seconds = day * k_day + second;
      Fields end = fields_at(seconds);
      end.day = length_of_month(end.year, end.month);
      ASSERT_EQ(time_of(seconds).end_of_month().secs(), seconds_of(end));
    }
  }
}

TEST(zxtime, the_end_of_january_2038_is_beyond_all_times) {
  const std::int32_t start = (k_last_day - 18) * k_day;
  for (const std::int32_t seconds : {start, start + 1, INT32_MAX}) {
    EXPECT_ASSERTION(time_of(seconds).end_of_month(), "zxtime");
    kit::with_failures_dropped(
        [&] { EXPECT_EQ(time_of(seconds).end_of_month().secs(), seconds); });
  }
  EXPECT_EQ(time_of(start - 1).end_of_month().secs(), start - 1);
}

TEST(zxtime, days_are_added_as_seconds) {
  kit::with_failures_dropped([] {
    for (const std::int32_t from :
         {k_day, k_day + 1, 2 * k_day - 1, k_other_time, INT32_MAX}) {
      for (std::int64_t n = -25'000; n <= 25'000; ++n) {
        zxTime time = time_of(from);
        time.add_days(static_cast<std::int32_t>(n));
        const std::int64_t sum = from + n * k_day;
        ASSERT_EQ(time.secs(), sum >= k_day && sum <= INT32_MAX ? sum : from);
      }
    }
  });
}

TEST(zxtime, days_added_out_of_range_fail_an_assertion) {
  for (const std::int32_t n :
       {INT32_MIN, -49'711, -24'856, 24'856, 49'711, INT32_MAX}) {
    SCOPED_TRACE(n);
    zxTime time = time_of(k_other_time);
    EXPECT_ASSERTION(time.add_days(n), "zxtime");
    kit::with_failures_dropped([&] { time.add_days(n); });
    EXPECT_EQ(time.secs(), k_other_time);
  }
}

// Even a number of days that would lead to a time again.
TEST(zxtime, no_days_are_added_to_the_null_time) {
  for (const std::int32_t n : {0, 1, -1, 24'857, 30'000, 49'000}) {
    zxTime time;
    EXPECT_ASSERTION(time.add_days(n), "zxtime");
    kit::with_failures_dropped([&] { time.add_days(n); });
    EXPECT_TRUE(time.is_null());
  }
}

std::int32_t weekend_days_walked(std::int64_t from, std::int64_t to) {
  std::int32_t found = 0;
  for (std::int64_t at = from; at <= to; at += k_day) {
    const std::int32_t weekday = weekday_of(at / k_day);
    if (weekday == 5 || weekday == 6) ++found;
  }
  return found;
}

TEST(zxtime, weekend_days_are_those_met_in_steps_of_a_day) {
  // From Friday noon: the Saturday counts from noon on.
  const zxTime friday = time_of(k_day + 43'200);
  EXPECT_EQ(friday.count_weekend_days(friday), 1);
  EXPECT_EQ(friday.count_weekend_days(time_of(2 * k_day)), 1);
  EXPECT_EQ(friday.count_weekend_days(time_of(2 * k_day + 43'199)), 1);
  EXPECT_EQ(friday.count_weekend_days(time_of(2 * k_day + 43'200)), 2);
  EXPECT_EQ(friday.count_weekend_days(time_of(k_day + 43'199)), 0);

  for (std::int32_t from = k_day; from < 10 * k_day; from += 21'600) {
    for (std::int32_t to = k_day; to < 30 * k_day; to += 10'800) {
      ASSERT_EQ(time_of(from).count_weekend_days(time_of(to)),
                weekend_days_walked(from, to))
          << from << " to " << to;
    }
    ASSERT_EQ(time_of(from).count_weekend_days(time_of(INT32_MAX)),
              weekend_days_walked(from, INT32_MAX));
  }
}

TEST(zxtime, there_is_no_weekend_from_or_to_the_null_time) {
  EXPECT_EQ(zxTime().count_weekend_days(time_of(INT32_MAX)), 0);
  EXPECT_EQ(time_of(k_day).count_weekend_days(zxTime()), 0);
  EXPECT_EQ(zxTime().count_weekend_days(zxTime()), 0);
}

// ---- from and to moments

TEST(zxtime, a_moment_is_shown_by_the_standard_time_of_the_zone) {
  for (const Zone& zone : k_zones) {
    SCOPED_TRACE(zone.name);
    const InZone here(zone.name);
    // In winter and in summer.
    for (const std::int64_t moment :
         {std::int64_t{200'000}, std::int64_t{1'230'768'000},
          std::int64_t{1'246'449'600}, std::int64_t{2'147'000'000}}) {
      zxTime time;
      EXPECT_TRUE(time.set_time_t(moment));
      EXPECT_EQ(time.secs(), moment - zone.behind);
      EXPECT_EQ(time.to_time_t(), moment);
    }
  }
}

TEST(zxtime, a_moment_in_the_first_day_of_1970_is_no_time) {
  for (const Zone& zone : k_zones) {
    SCOPED_TRACE(zone.name);
    const InZone here(zone.name);
    zxTime time = time_of(k_other_time);
    for (const std::int64_t seconds :
         {std::int64_t{k_day - 1}, std::int64_t{1}, std::int64_t{0}}) {
      EXPECT_FALSE(time.set_time_t(seconds + zone.behind));
      EXPECT_TRUE(time.is_null());
    }
    EXPECT_TRUE(time.set_time_t(k_day + zone.behind));
    EXPECT_EQ(time.secs(), k_day);
    for (const std::int64_t moment :
         {std::int64_t{-1}, std::int64_t{INT32_MIN},
          std::int64_t{INT32_MIN} - 1, std::int64_t{INT64_MIN}}) {
      EXPECT_FALSE(time.set_time_t(moment));
      EXPECT_TRUE(time.is_null());
    }
  }
}

TEST(zxtime, moments_and_times_end_at_32_bits) {
  zxTime time;
  {
    const InZone west("EST5EDT");
    EXPECT_TRUE(time.set_time_t(INT32_MAX));
    EXPECT_EQ(time.secs(), INT32_MAX - 18'000);
    EXPECT_EQ(time.to_time_t(), INT32_MAX);
    EXPECT_FALSE(time.set_time_t(std::int64_t{INT32_MAX} + 1));
    EXPECT_TRUE(time.is_null());
    EXPECT_EQ(time_of(INT32_MAX - 17'999).to_time_t(), -1);
    EXPECT_EQ(time_of(INT32_MAX).to_time_t(), -1);
  }
  {
    const InZone east("NPT-5:45");
    EXPECT_TRUE(time.set_time_t(INT32_MAX - 20'700));
    EXPECT_EQ(time.secs(), INT32_MAX);
    EXPECT_FALSE(time.set_time_t(INT32_MAX - 20'699));
    EXPECT_TRUE(time.is_null());
    EXPECT_EQ(time_of(INT32_MAX).to_time_t(), INT32_MAX - 20'700);
  }
  EXPECT_FALSE(time.set_time_t(INT64_MAX));
  EXPECT_TRUE(time.is_null());
}

TEST(zxtime, the_null_time_is_the_lowest_moment) {
  for (const Zone& zone : k_zones) {
    const InZone here(zone.name);
    EXPECT_EQ(zxTime().to_time_t(), INT32_MIN);
  }
}

// ---- from fields

// What try_set() gives, and what it leaves of another time.
struct Set {
  bool result;
  std::int32_t seconds;

  friend bool operator==(const Set&, const Set&) = default;
};
constexpr Set k_refused = {false, k_other_time};
constexpr Set k_nulled = {false, k_null};

std::ostream& operator<<(std::ostream& out, const Set& set) {
  return out << set.result << ' ' << set.seconds;
}

Set set_to(const Fields& f) {
  zxTime time = time_of(k_other_time);
  const bool result =
      time.try_set(f.year, f.month, f.day, f.hour, f.minute, f.second);
  return {result, time.secs()};
}

// The rule, in a zone.
Set expected_of(Fields f, std::int32_t behind) {
  if (f.year >= 0 && f.year <= 57) f.year += 2000;
  if (f.year >= 70 && f.year <= 100) f.year += 1900;
  const std::optional<std::int64_t> seconds = seconds_of(f);
  if (f.year < 1970 || f.year > 2038 || f.month > 12 || f.day > 31 ||
      f.hour < 0 || f.hour > 23 || f.second < 0 || f.second > 59 || !seconds)
    return k_refused;
  if (*seconds < k_day || *seconds > INT32_MAX || *seconds + behind > INT32_MAX)
    return k_nulled;
  return {true, static_cast<std::int32_t>(*seconds)};
}

TEST(zxtime, fields_set_worked_out_by_hand) {
  const InZone utc("UTC0");
  const struct {
    Fields fields;
    Set set;
  } rows[] = {
      {{1998, 11, 27, 14, 22, 3}, {true, 912'176'523}},
      {{98, 11, 27, 14, 22, 4}, {true, 912'176'524}},
      {{1970, 1, 2, 0, 0, 0}, {true, k_day}},
      {{70, 1, 2, 0, 0, 0}, {true, k_day}},
      {{2038, 1, 19, 3, 14, 7}, {true, INT32_MAX}},
      {{0, 1, 1, 0, 0, 0}, {true, 946'684'800}},
      {{100, 1, 1, 0, 0, 0}, {true, 946'684'800}},
      {{37, 12, 31, 23, 59, 59}, {true, 2'145'916'799}},
      // The first day of 1970, and what is beyond 32 bits.
      {{1970, 1, 1, 0, 0, 0}, k_nulled},
      {{1970, 1, 1, 23, 59, 59}, k_nulled},
      {{2038, 1, 19, 3, 14, 8}, k_nulled},
      {{2038, 12, 31, 23, 59, 59}, k_nulled},
      // Out of range.
      {{2039, 1, 1, 0, 0, 0}, k_refused},
      {{39, 1, 1, 0, 0, 0}, k_refused},
      {{57, 1, 1, 0, 0, 0}, k_refused},
      {{58, 1, 1, 0, 0, 0}, k_refused},
      {{69, 1, 1, 0, 0, 0}, k_refused},
      {{101, 1, 1, 0, 0, 0}, k_refused},
      {{1969, 12, 31, 0, 0, 0}, k_refused},
      {{-1, 1, 1, 0, 0, 0}, k_refused},
      {{2000, 0, 1, 0, 0, 0}, k_refused},
      {{2000, 13, 1, 0, 0, 0}, k_refused},
      {{2000, 1, 0, 0, 0, 0}, k_refused},
      {{2000, 1, 32, 0, 0, 0}, k_refused},
      {{2001, 2, 29, 0, 0, 0}, k_refused},
      {{2000, 2, 29, 0, 0, 0}, {true, 951'782'400}},
      {{2000, 4, 31, 0, 0, 0}, k_refused},
      {{2000, 1, 1, -1, 0, 0}, k_refused},
      {{2000, 1, 1, 24, 0, 0}, k_refused},
      {{2000, 1, 1, 0, 0, -1}, k_refused},
      {{2000, 1, 1, 0, 0, 60}, k_refused},
      {{INT32_MIN, INT32_MIN, INT32_MIN, INT32_MIN, INT32_MIN, INT32_MIN},
       k_refused},
      {{INT32_MAX, INT32_MAX, INT32_MAX, INT32_MAX, INT32_MAX, INT32_MAX},
       k_refused},
      // Any number of minutes.
      {{2038, 1, 1, 0, 75, 0}, {true, 2'145'921'300}},
      {{2000, 1, 1, 0, 60, 0}, {true, 946'688'400}},
      {{2000, 1, 1, 0, -1, 0}, {true, 946'684'740}},
      {{2000, 1, 1, 0, 1'000'000, 0}, {true, 1'006'684'800}},
      {{1970, 1, 1, 0, 1440, 0}, {true, k_day}},
      {{1970, 1, 1, 0, -1, 0}, k_nulled},
      {{2000, 1, 1, 0, INT32_MAX, 0}, k_nulled},
      {{2000, 1, 1, 0, INT32_MIN, 0}, k_nulled},
  };
  for (const auto& row : rows)
    EXPECT_EQ(set_to(row.fields), row.set) << row.fields;
}

TEST(zxtime, every_day_is_set_as_told) {
  const InZone utc("UTC0");
  for (std::int32_t year = 0; year <= 2060; ++year) {
    if (year == 120) year = 1965;
    for (std::int32_t month = 0; month <= 13; ++month) {
      for (std::int32_t day = 0; day <= 32; ++day) {
        const Fields fields = {year, month, day, day % 24, day, 59 - day};
        ASSERT_EQ(set_to(fields), expected_of(fields, 0)) << fields;
      }
    }
  }
}

// Zones that have moved their standard time, saved daylight in winter, or left
// a day out.
constexpr const char* k_moved_zones[] = {
    "Europe/Moscow",       "Asia/Amman",        "Europe/Istanbul",
    "Pacific/Apia",        "Africa/Casablanca", "Europe/London",
    "Asia/Jerusalem",      "Europe/Dublin",     "America/New_York",
    "Australia/Lord_Howe",
};

TEST(zxtime, a_time_shows_what_it_was_set_to_where_the_zone_has_moved) {
  if (!std::filesystem::exists("/usr/share/zoneinfo/Europe/Moscow"))
    GTEST_SKIP() << "there are no files of zones here";
  for (const char* zone : k_moved_zones) {
    SCOPED_TRACE(zone);
    const InZone here(zone);
    for (std::int32_t year = 1970; year <= 2037; ++year) {
      for (std::int32_t month = 1; month <= 12; ++month) {
        const Fields fields = {year, month, 16, 2, 30, 15};
        EXPECT_EQ(set_to(fields), expected_of(fields, 0)) << fields;
      }
    }
  }
}

// Also in the hours that a change of clocks leaves out and repeats: such a
// change is not known here.
TEST(zxtime, fields_are_those_of_the_local_clock_in_every_zone) {
  for (const Zone& zone : k_zones) {
    SCOPED_TRACE(zone.name);
    const InZone here(zone.name);
    for (std::int32_t month = 1; month <= 12; ++month) {
      for (std::int32_t day = 1; day <= 31; ++day) {
        for (std::int32_t hour = 0; hour < 24; ++hour) {
          const Fields fields = {2009, month, day, hour, 30, 15};
          ASSERT_EQ(set_to(fields), expected_of(fields, zone.behind)) << fields;
        }
      }
    }
    zxTime time;
    ASSERT_TRUE(time.try_set(2009, 7, 1, 12, 0, 0));
    EXPECT_EQ(time.to_time_t(), 1'246'449'600 + zone.behind);
    const Fields first = {1970, 1, 2, 0, 0, 0};
    EXPECT_EQ(set_to(first), (Set{true, k_day}));
    const Fields early = {1970, 1, 1, 23, 59, 59};
    EXPECT_EQ(set_to(early), k_nulled);
  }
}

TEST(zxtime, the_last_times_of_every_zone) {
  for (const Zone& zone : k_zones) {
    SCOPED_TRACE(zone.name);
    const InZone here(zone.name);
    for (std::int32_t day = 17; day <= 21; ++day) {
      for (std::int32_t hour = 0; hour < 24; ++hour) {
        for (const std::int32_t second : {7, 8}) {
          const Fields fields = {2038, 1, day, hour, 14, second};
          EXPECT_EQ(set_to(fields), expected_of(fields, zone.behind)) << fields;
        }
      }
    }
  }
}

TEST(zxtime, set_gives_the_time_or_fails) {
  const InZone utc("UTC0");
  zxTime time;
  time.set(1998, 11, 27, 14, 22, 3);
  EXPECT_EQ(time.secs(), k_other_time);
  for (const Fields& f : {Fields{2039, 1, 1, 0, 0, 0}, Fields{0, 0, 0, 0, 0, 0},
                          Fields{2000, 1, 1, 24, 0, 0}}) {
    EXPECT_FAILURE(time.set(f.year, f.month, f.day, f.hour, f.minute, f.second),
                   k_bad_time, k_bad_time_line);
    EXPECT_EQ(time.secs(), k_other_time);
  }
  EXPECT_FAILURE(time.set(1970, 1, 1, 12, 0, 0), k_bad_time, k_bad_time_line);
  EXPECT_TRUE(time.is_null());
}

// ---- parsing

Set parsed(const char* text) {
  zxTime time = time_of(k_other_time);
  const bool result = time.parse(text);
  return {result, time.secs()};
}

std::string text_in(const Set& set) {
  if (set == k_refused) return "no";
  if (set == k_nulled) return "null, false";
  if (!set.result) return "changed by a failure";
  return set.seconds == k_null ? "null" : text_of(fields_at(set.seconds));
}

TEST(zxtime, texts_that_are_times_and_such_that_are_not) {
  const InZone utc("UTC0");
  const struct {
    const char* text;
    const char* result;
  } rows[] = {
      {"", "null"},
      {"25/02/09", "25-02-2009 00:00:00"},
      {"25.02.2009", "25-02-2009 00:00:00"},
      {"25-02-09 14:05:06", "25-02-2009 14:05:06"},
      {"25/02/09 14:05:06", "25-02-2009 14:05:06"},
      {"25/02/09\t14:05:06", "25-02-2009 14:05:06"},
      {"25/02/09\n14:05:06", "25-02-2009 14:05:06"},
      {"25/02/09\r4:5:6", "25-02-2009 04:05:06"},
      {"25/02/09\v4:5:6", "25-02-2009 04:05:06"},
      {"25/02/09\f004:005:006", "25-02-2009 04:05:06"},
      {"25/02/09 23:59:59", "25-02-2009 23:59:59"},
      {"25/02/09 0:0:0", "25-02-2009 00:00:00"},
      // The minute is not tested.
      {"25/02/09 14:75:00", "25-02-2009 15:15:00"},
      {"25/02/09 14:1440:00", "26-02-2009 14:00:00"},
      {"25/02/09 14:2147483647:00", "null, false"},
      {"25/02/09 14:2147483648:00", "no"},
      {"25/02/09 14:4294967296:00", "no"},
      // Out of range.
      {"25/02/09 24:00:00", "no"},
      {"25/02/09 14:00:60", "no"},
      {"25/02/09 14:00:-1", "no"},
      {"25/02/09 4294967296:00:00", "no"},
      {"25/02/09 00:00:4294967296", "no"},
      {"31/04/05", "no"},
      {"31/04/05 1:2:3", "no"},
      {"29.2.04 1:2:3", "29-02-2004 01:02:03"},
      {"29.2.05 1:2:3", "no"},
      {"1/13/05", "no"},
      {"0/1/05", "no"},
      {"1/1/39", "no"},
      {"1/1/2039", "no"},
      {"1/1/57", "no"},
      {"1/1/58", "no"},
      {"1/1/69", "no"},
      {"1/1/100", "01-01-2000 00:00:00"},
      {"1/1/101", "no"},
      // No time, though each of its numbers is good.
      {"1/1/1970", "null, false"},
      {"1/1/70", "null, false"},
      {"1/1/70 23:59:59", "null, false"},
      {"2/1/70", "02-01-1970 00:00:00"},
      {"19/1/2038 3:14:7", "19-01-2038 03:14:07"},
      {"19/1/2038 3:14:8", "null, false"},
      {"31/12/38", "null, false"},
      // Other shapes.
      {" ", "no"},
      {"x", "no"},
      {"1", "no"},
      {"1/", "no"},
      {"1/2", "no"},
      {"1-2/03", "no"},
      {"1/2-03 1:2:3", "no"},
      {"1,2,03", "no"},
      {" 1/2/03", "no"},
      {"1/2/03x", "no"},
      {"1/2/03/", "no"},
      {"1/2/03 ", "no"},
      {"1/2/03 4", "no"},
      {"1/2/03 4:", "no"},
      {"1/2/03 4:5", "no"},
      {"1/2/03 4.5.6", "no"},
      {"1/2/03 4:5.6", "no"},
      {"1/2/03 4.5:6", "no"},
      {"1/2/03 4;5;6", "no"},
      {"1/2/03T4:5:6", "no"},
      {"1/2/03:4:5:6", "no"},
      // Digits that are missing count as 0.
      {"1/2/", "01-02-2000 00:00:00"},
      {"1/2/03 4:5:", "01-02-2003 04:05:00"},
      {"1/2/03 4:5:x", "01-02-2003 04:05:00"},
      {"1/2/03 ::", "01-02-2003 00:00:00"},
      {"1/2/03 :5:6", "01-02-2003 00:05:06"},
      {"1/2/03 4::6", "01-02-2003 04:00:06"},
      // Nothing behind the second is looked at.
      {"1/2/03 4:5:6x", "01-02-2003 04:05:06"},
      {"1/2/03 4:5:6:7", "01-02-2003 04:05:06"},
      {"1/2/03 4:5:6 pm", "01-02-2003 04:05:06"},
      // White space and signs.
      {"1/2/03  4:5:6", "no"},
      {"1/2/03 \t4:5:6", "no"},
      {"1/2/03 +4:5:6", "no"},
      {"1/2/03 -4:5:6", "no"},
      {"1/2/03 4 :5:6", "no"},
      {"1/2/03 4: 5:6", "no"},
      {"1/2/03 4:-5:6", "no"},
      {"1/2/03 4:5: 6", "01-02-2003 04:05:06"},
      {"1/2/03 4:5:+6", "01-02-2003 04:05:06"},
      {"1/2/03 4:5:+ 6", "01-02-2003 04:05:00"},
      {"1/2/03\xA0"
       "4:5:6",
       "no"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(text_in(parsed(row.text)), row.result) << row.text;
}

// The year passes over the blank, the place does not: what the year was read
// from serves as the hour as well.
TEST(zxtime, a_year_behind_a_blank_is_the_hour_too) {
  const InZone utc("UTC0");
  EXPECT_EQ(text_in(parsed("1/2/ 04:05:06")), "01-02-2004 04:05:06");
}

TEST(zxtime, null_and_empty_text_are_the_null_time) {
  EXPECT_EQ(parsed(nullptr), (Set{true, k_null}));
  zxTime time = time_of(k_other_time);
  EXPECT_TRUE(time.parse(zxStr()));
  EXPECT_TRUE(time.is_null());
}

TEST(zxtime, a_string_is_parsed_up_to_a_nul) {
  const InZone utc("UTC0");
  zxTime time;
  EXPECT_TRUE(time.parse(zxStr("25/02/09 14:05:06")));
  EXPECT_EQ(text_of(time.to_text()), "25-02-2009 14:05:06");
  EXPECT_TRUE(
      time.parse(zxStr("25/02/09 1:2:3\0"
                       "4",
                       16)));
  EXPECT_EQ(text_of(time.to_text()), "25-02-2009 01:02:03");
  EXPECT_TRUE(
      time.parse(zxStr("\0"
                       "1/2/3",
                       6)));
  EXPECT_TRUE(time.is_null());
}

TEST(zxtime, the_text_of_every_day_is_parsed_again) {
  const InZone utc("UTC0");
  for (std::int32_t day = 1; day < k_last_day; ++day) {
    for (const std::int32_t second : k_seconds) {
      const zxTime time = time_of(day * k_day + second);
      zxTime again;
      ASSERT_TRUE(again.parse(time.to_text()));
      ASSERT_EQ(again, time);
    }
  }
}

// Each text ends at the end of the memory that can be read.
TEST(zxtime, no_byte_behind_the_end_of_a_text_is_read) {
  const kit::GuardedMemory memory(100);
  for (const char* whole :
       {"25/02/09 14:05:06", "1.2.3  ", "1-2-03 4:5:+",
        "1-2-03 4:5:  ", "1-2-03 99999999999:1:1", "1-2-03 1:99999999999:1",
        "1-2-03 :::", "1-2-03 4:5:99999999999"}) {
    for (std::size_t length = 0; length <= std::strlen(whole); ++length) {
      char* const text = memory.end() - length - 1;
      std::memcpy(text, whole, length);
      text[length] = '\0';
      EXPECT_EQ(parsed(text), parsed(std::string(whole, length).c_str()));
    }
  }
}

// ---- text forms

TEST(zxtime, the_forms_of_a_time) {
  const char* const rows[] = {
      "27-11-98 14:22:03", "27-11-98",       "14:22:03",
      "98/11/27 14:22:03", "27-11-98 14:22", "Nov-27 14:22",
  };
  for (std::int32_t index = 0; index <= 5; ++index)
    EXPECT_EQ(text_of(time_of(k_other_time).format(index)), rows[index]);
}

// The form of fields by its number.
std::string form_of(const Fields& f, std::int32_t index) {
  constexpr const char* k_months[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                      "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
  char date[40], back[40], clock[40], text[100];
  std::snprintf(date, sizeof date, "%.2d-%.2d-%.2d", static_cast<int>(f.day),
                static_cast<int>(f.month), static_cast<int>(f.year % 100));
  std::snprintf(back, sizeof back, "%.2d/%.2d/%.2d",
                static_cast<int>(f.year % 100), static_cast<int>(f.month),
                static_cast<int>(f.day));
  std::snprintf(clock, sizeof clock, "%.2d:%.2d:%.2d", static_cast<int>(f.hour),
                static_cast<int>(f.minute), static_cast<int>(f.second));
  std::snprintf(text, sizeof text, "%s-%.2d", k_months[f.month - 1],
                static_cast<int>(f.day));
  const std::string minute = std::string(clock, 5);
  switch (index) {
    case 0:
      return std::string(date) + " " + clock;
    case 1:
      return date;
    case 2:
      return clock;
    case 3:
      return std::string(back) + " " + clock;
    case 4:
      return std::string(date) + " " + minute;
    default:
      return std::string(text) + " " + minute;
  }
}

TEST(zxtime, the_forms_of_every_day) {
  for (std::int32_t day = 1; day < k_last_day; ++day) {
    const std::int32_t seconds = day * k_day + day * 7 % k_day;
    for (std::int32_t index = 0; index <= 5; ++index)
      ASSERT_EQ(text_of(time_of(seconds).format(index)),
                form_of(fields_at(seconds), index));
  }
}

TEST(zxtime, the_forms_of_a_time_do_not_depend_on_the_zone) {
  for (const Zone& zone : k_zones) {
    const InZone here(zone.name);
    EXPECT_EQ(text_of(time_of(k_other_time).format(0)), "27-11-98 14:22:03");
    EXPECT_EQ(text_of(time_of(k_other_time).to_text()), "27-11-1998 14:22:03");
    EXPECT_EQ(time_of(k_other_time).hour(), 14);
  }
}

TEST(zxtime, another_index_fails_an_assertion) {
  for (const std::int32_t index : {INT32_MIN, -1, 6, 7, INT32_MAX}) {
    SCOPED_TRACE(index);
    EXPECT_ASSERTION(time_of(k_other_time).format(index), "zxtime");
    EXPECT_ASSERTION(format_time_t(1'000'000, index), "zxtime");
    kit::with_failures_dropped([&] {
      EXPECT_EQ(text_of(time_of(k_other_time).format(index)), "");
      EXPECT_EQ(text_of(format_time_t(1'000'000, index)), "");
    });
  }
}

TEST(zxtime, a_moment_without_a_local_time_shows_as_zeros) {
  const char* const rows[] = {
      "01-01-00 00:00:00", "01-01-00",       "00:00:00",
      "00/01/01 00:00:00", "01-01-00 00:00", "Jan-01 00:00",
  };
  for (const Zone& zone : k_zones) {
    const InZone here(zone.name);
    for (const std::int64_t moment :
         {std::int64_t{0}, std::int64_t{-1}, std::int64_t{-5},
          std::int64_t{INT32_MIN}, std::int64_t{INT64_MIN},
          std::int64_t{32'535'216'000}, std::int64_t{INT64_MAX}}) {
      for (std::int32_t index = 0; index <= 5; ++index)
        EXPECT_EQ(text_of(format_time_t(moment, index)), rows[index]);
      const std::tm fields = local_fields(moment);
      EXPECT_EQ(fields.tm_year, 0);
      EXPECT_EQ(fields.tm_mon, 0);
      EXPECT_EQ(fields.tm_mday, 1);
      EXPECT_EQ(fields.tm_hour, 0);
      EXPECT_EQ(fields.tm_min, 0);
      EXPECT_EQ(fields.tm_sec, 0);
      EXPECT_EQ(fields.tm_wday, 0);
      EXPECT_EQ(fields.tm_yday, 0);
      EXPECT_EQ(fields.tm_isdst, 0);
    }
  }
}

TEST(zxtime, the_first_moment_has_a_local_time) {
  const InZone utc("UTC0");
  EXPECT_EQ(text_of(format_time_t(1, 0)), "01-01-70 00:00:01");
}

// ---- forms of one's own

// 2001-09-09 01:46:40 was a Sunday, 2009-07-01 12:00:00 a Wednesday and
// 1970-01-01 00:00:01 a Thursday, UTC.  Week 1 of %U starts with the first
// Sunday of a year, that of %W with the first Monday.
constexpr std::int64_t k_moments[] = {1'000'000'000, 1'246'449'600, 1};

struct Letter {
  const char* form;
  const char* texts[std::size(k_moments)];
};

TEST(zxtime, the_letters_of_forms) {
  const InZone utc("UTC0");
  const Letter k_rows[] = {
      {"%a", {"Sun", "Wed", "Thu"}},
      {"%A", {"Sunday", "Wednesday", "Thursday"}},
      {"%b", {"Sep", "Jul", "Jan"}},
      {"%B", {"September", "July", "January"}},
      {"%c", {"09/09/01 01:46:40", "07/01/09 12:00:00", "01/01/70 00:00:01"}},
      {"%d", {"09", "01", "01"}},
      {"%H", {"01", "12", "00"}},
      {"%I", {"01", "12", "12"}},
      {"%j", {"252", "182", "001"}},
      {"%m", {"09", "07", "01"}},
      {"%M", {"46", "00", "00"}},
      {"%p", {"AM", "PM", "AM"}},
      {"%S", {"40", "00", "01"}},
      {"%U", {"36", "26", "00"}},
      {"%w", {"0", "3", "4"}},
      {"%W", {"36", "26", "00"}},
      {"%x", {"09/09/01", "07/01/09", "01/01/70"}},
      {"%X", {"01:46:40", "12:00:00", "00:00:01"}},
      {"%y", {"01", "09", "70"}},
      {"%Y", {"2001", "2009", "1970"}},
      {"%%", {"%", "%", "%"}},
      {"", {"", "", ""}},
      {"%Y%m%d-%H%M%S",
       {"20010909-014640", "20090701-120000", "19700101-000001"}},
      {" a%%Y \xE0\n%d.",
       {" a%Y \xE0\n09.", " a%Y \xE0\n01.", " a%Y \xE0\n01."}},
  };
  for (const Letter& row : k_rows)
    for (std::size_t i = 0; i < std::size(k_moments); ++i)
      EXPECT_EQ(text_of(format_moment(k_moments[i], row.form)), row.texts[i])
          << row.form;
}

TEST(zxtime, the_name_of_the_zone_in_one_letter) {
  const InZone utc("UTC0");
  // Wine cuts it short.
  EXPECT_EQ(text_of(format_moment(1'000'000'000, "%Z")).substr(0, 2), "UT");
}

TEST(zxtime, a_form_with_another_letter_has_no_text) {
  const InZone utc("UTC0");
  const std::string k_letters = "aAbBcdHIjmMpSUwWxXyYZ%";
  for (int byte = 1; byte < 256; ++byte) {
    SCOPED_TRACE(byte);
    const char letter = static_cast<char>(byte);
    const bool is_known = k_letters.find(letter) != k_letters.npos;
    const std::string form = std::string("%d%") + letter + "%m";
    const std::string text =
        text_of(format_moment(1'000'000'000, form.c_str()));
    EXPECT_EQ(text.empty(), !is_known) << text;
  }
  for (const char* form : {"%", "abc%", "%%%", "%d%", "%5d", "%-d", "%#d",
                           "%Ey", "%Od", "% d", "%\n"})
    EXPECT_EQ(text_of(format_moment(1'000'000'000, form)), "") << form;
}

TEST(zxtime, a_text_of_a_form_has_up_to_79_bytes) {
  const InZone utc("UTC0");
  const auto shown = [](const std::string& form) {
    return text_of(format_moment(1'000'000'000, form.c_str()));
  };
  EXPECT_EQ(shown(std::string(79, 'x')), std::string(79, 'x'));
  EXPECT_EQ(shown(std::string(80, 'x')), "");
  EXPECT_EQ(shown(std::string(75, 'x') + "%Y"), std::string(75, 'x') + "2001");
  EXPECT_EQ(shown(std::string(76, 'x') + "%Y"), "");
  EXPECT_EQ(shown(std::string(10'000, 'x')), "");
  // The form itself may be longer.
  std::string form, text;
  for (int i = 0; i < 79; ++i) form += "%w", text += '0';
  EXPECT_EQ(shown(form), text);
  EXPECT_EQ(shown(form + "%w"), "");
}

TEST(zxtime, forms_show_the_local_clock) {
  const auto shown_in = [](const char* zone) {
    const InZone here(zone);
    return text_of(format_moment(1'000'000'000, "%a %d %H:%M"));
  };
  EXPECT_EQ(shown_in("UTC0"), "Sun 09 01:46");
  EXPECT_EQ(shown_in("EST5"), "Sat 08 20:46");
  EXPECT_EQ(shown_in("NPT-5:45"), "Sun 09 07:31");
}

TEST(zxtime, a_form_of_a_moment_without_a_local_time_shows_zeros) {
  for (const std::int64_t moment :
       {std::int64_t{0}, std::int64_t{-1}, std::int64_t{32'535'216'000}})
    EXPECT_EQ(text_of(format_moment(moment, "%Y-%m-%d %H:%M:%S %y %j %w")),
              "1900-01-01 00:00:00 00 001 0");
}

// ---- zones that save daylight: in processes of their own, since a runtime may
// keep to the first zone's rules

// Moments when the clocks of all such zones are, and are not, changed: noon
// of 2009-07-01 and of 2009-01-01, UTC.
constexpr std::int64_t k_summer = 1'246'449'600;
constexpr std::int64_t k_winter = 1'230'811'200;
// 21:30 of 2009-06-30 and 22:30 of 2009-12-31, UTC.
constexpr std::int64_t k_summer_evening = 1'246'397'400;
constexpr std::int64_t k_winter_evening = 1'262'298'600;

std::string date_of_moment(std::int64_t moment) {
  zxDate date;
  date.set_from_time_t(moment);
  return text_of(date.to_text_full());
}

// The form 0 of a time of a moment.
std::string time_of_moment(std::int64_t moment) {
  zxTime time;
  return time.set_time_t(moment) ? text_of(time.format(0)) : "none";
}

// A question is a letter and a moment, which is also now: the form of the
// digit, the date, today, now, the time.
std::string answer(const std::string& question) {
  const std::int64_t moment = std::stoll(question.substr(1));
  const Clock clock(moment);
  switch (question[0]) {
    case 'd':
      return date_of_moment(moment);
    case 't':
      return text_of(zxDate::today().to_text_full());
    case 'n':
      return text_of(format_time_t({}, 5));
    case 's':
      return time_of_moment(moment);
    default:
      return text_of(format_time_t(moment, question[0] - '0'));
  }
}

ZX_CASE(zxtime_in_zone) {
  zxplat::set_binary(zxplat::k_stdout_fd);
  for (int i = 1; i < argc; ++i)
    zxplat::write_all(zxplat::k_stdout_fd, answer(argv[i]) + "\n");
  return 0;
}

std::string ask(char letter, std::int64_t moment) {
  return letter + std::to_string(moment);
}

struct Row {
  std::string question;
  std::string expected;
};

void expect_in_zone(const char* zone, const std::vector<Row>& rows) {
  SCOPED_TRACE(zone);
  std::vector<std::string> questions;
  std::string expected;
  for (const Row& row : rows) {
    questions.push_back(row.question);
    expected += row.expected + "\n";
  }
  kit::ProcessOptions options;
  options.variables = {{"TZ", zone}};
  const kit::ProcessResult result =
      kit::run_case("zxtime_in_zone", questions, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, expected);
}

TEST(zxtime, a_moment_shows_with_daylight_saving) {
  for (const Zone& zone : k_zones) {
    const std::int32_t ahead = (zone.saves_daylight ? 3600 : 0) - zone.behind;
    std::vector<Row> rows;
    for (std::int32_t index = 0; index <= 5; ++index) {
      const char digit = static_cast<char>('0' + index);
      rows.push_back(
          {ask(digit, k_summer), form_of(fields_at(k_summer + ahead), index)});
      rows.push_back({ask(digit, k_winter),
                      form_of(fields_at(k_winter - zone.behind), index)});
    }
    // The time of the same moment knows standard time alone.
    rows.push_back(
        {ask('s', k_summer), form_of(fields_at(k_summer - zone.behind), 0)});
    expect_in_zone(zone.name, rows);
  }
}

TEST(zxtime, without_a_moment_now_is_shown) {
  expect_in_zone("IST-2IDT", {{ask('n', k_summer), "Jul-01 15:00"},
                              {ask('n', k_winter), "Jan-01 14:00"}});
}

TEST(zxtime, the_date_of_a_moment_is_the_local_one) {
  expect_in_zone("UTC0", {{ask('d', k_summer_evening), "30-06-2009"},
                          {ask('d', k_winter_evening), "31-12-2009"},
                          {ask('d', 1), "01-01-1970"},
                          {ask('d', INT32_MAX), "19-01-2038"},
                          // Behind the end of times, to the end of dates.
                          {ask('d', 2'777'068'799), "31-12-2057"}});
  expect_in_zone("IST-2IDT", {{ask('d', k_summer_evening), "01-07-2009"},
                              {ask('d', k_winter_evening), "01-01-2010"},
                              {ask('d', k_summer_evening - 1800), "01-07-2009"},
                              {ask('d', k_summer_evening - 1801), "30-06-2009"},
                              {ask('d', k_winter_evening - 1801), "31-12-2009"},
                              {ask('t', k_summer_evening), "01-07-2009"}});
  expect_in_zone("EST5EDT", {{ask('d', k_summer_evening), "30-06-2009"},
                             {ask('d', k_winter_evening), "31-12-2009"},
                             {ask('t', k_summer_evening), "30-06-2009"}});
}

// ---- dates of moments

TEST(zxtime, a_moment_whose_local_date_is_in_1969_or_2058_is_a_bad_date) {
  const InZone zone("BKT12");
  for (const std::int64_t moment :
       {std::int64_t{1}, std::int64_t{43'199}, std::int64_t{2'777'112'000}}) {
    zxDate date = zxDate::from_stored(12'345);
    EXPECT_FAILURE(date.set_from_time_t(moment), "1801: setdate: bad date",
                   "[1801-1801-0/E-0/E//]");
    EXPECT_EQ(date.days(), 12'345);
  }
  EXPECT_EQ(date_of_moment(43'200), "01-01-1970");
  EXPECT_EQ(date_of_moment(2'777'111'999), "31-12-2057");
}

}  // namespace
