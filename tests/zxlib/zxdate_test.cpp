// zxdate_test.cpp - calendar dates: every operation on every day of the
// calendar against the standard library's, the counts outside of it, the
// texts and their parsing.  What depends on the zone is in zxtime_test.cpp.
// Tests zxlib/zxdate.h and zxdate.cpp.
#include "zxdate.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <functional>
#include <optional>
#include <string>

#include "kit/failure.h"
#include "kit/target.h"
#include "zxtime.h"

namespace {

constexpr std::int32_t k_last_day = 32141;  // 2057-12-31

std::string text_of(zxDate date) {
  const zxStr text = date.to_text();
  return std::string(text.view());
}

struct Fields {
  std::int32_t year = -1;
  std::int32_t month = -2;
  std::int32_t day = -3;

  friend bool operator==(const Fields&, const Fields&) = default;
};

std::ostream& operator<<(std::ostream& out, const Fields& fields) {
  return out << fields.year << '-' << fields.month << '-' << fields.day;
}

Fields fields_of(zxDate date) {
  Fields fields;
  EXPECT_TRUE(date.get_full(fields.year, fields.month, fields.day));
  return fields;
}

// The standard library's calendar.
Fields fields_of_count(std::int32_t count) {
  const std::chrono::year_month_day date{
      std::chrono::sys_days(std::chrono::days(count))};
  return {static_cast<int>(date.year()),
          static_cast<std::int32_t>(static_cast<unsigned>(date.month())),
          static_cast<std::int32_t>(static_cast<unsigned>(date.day()))};
}

std::string text_of_fields(const Fields& fields) {
  char text[40];
  std::snprintf(text, sizeof text, "%.2d-%.2d-%.2d",
                static_cast<int>(fields.day), static_cast<int>(fields.month),
                static_cast<int>(fields.year % 100));
  return text;
}

zxDate date_of(std::int32_t count) {
  return zxDate::from_stored(static_cast<std::int16_t>(count));
}

bool is_in_calendar(std::int32_t count) {
  return count >= 0 && count <= k_last_day;
}

// The standard library's date of fields; none if it has no such day.
std::optional<std::int32_t> count_of_fields(const Fields& fields) {
  const std::chrono::year_month_day date{
      std::chrono::year(fields.year),
      std::chrono::month(static_cast<unsigned>(fields.month)),
      std::chrono::day(static_cast<unsigned>(fields.day))};
  if (!date.ok()) return {};
  return std::chrono::sys_days(date).time_since_epoch().count();
}

std::int32_t length_of_month(std::int32_t year, std::int32_t month) {
  const auto last = std::chrono::year_month_day_last(
      std::chrono::year(year), std::chrono::month_day_last(std::chrono::month(
                                   static_cast<unsigned>(month))));
  return static_cast<std::int32_t>(static_cast<unsigned>(last.day()));
}

// What set() makes of fields: the count, or none where it fails.
std::optional<std::int32_t> count_set(Fields fields) {
  if (fields.year >= 0 && fields.year <= 57) fields.year += 2000;
  if (fields.year >= 70 && fields.year <= 99) fields.year += 1900;
  if (fields.year < 1970 || fields.year > 2057 || fields.month < 1 ||
      fields.month > 12 || fields.day < 1 || fields.day > 31)
    return {};
  return *count_of_fields({fields.year, fields.month, 1}) + fields.day - 1;
}

// The count that a change leaves behind, failures being dropped; none if the
// change did not succeed.
std::optional<std::int32_t> changed(
    std::int32_t count, const std::function<void(zxDate&)>& change) {
  zxDate date = date_of(count);
  const kit::Failure failure = kit::failure_of([&] { change(date); });
  if (!failure.failed) return date.days();
  EXPECT_EQ(date.days(), count) << "changed by a failure";
  return {};
}

constexpr char k_bad_date[] = "1801: setdate: bad date";
constexpr char k_bad_date_line[] = "[1801-1801-0/E-0/E//]";

// A date that no row of a test ends at.
constexpr std::int32_t k_other_day = 12345;

TEST(zxdate, the_default_is_the_first_of_january_1970) {
  const zxDate date;
  EXPECT_EQ(date.days(), 0);
  EXPECT_EQ(text_of(date), "01-01-70");
  static_assert(zxDate().days() == 0);
}

TEST(zxdate, is_its_count_and_nothing_else) {
  static_assert(sizeof(zxDate) == 2);
  static_assert(zxDate::from_stored(-32768).days() == -32768);
  static_assert(zxDate::from_stored(32767).days() == 32767);
  EXPECT_TRUE(date_of(5) == date_of(5));
  EXPECT_FALSE(date_of(5) == date_of(6));
  EXPECT_TRUE(date_of(0) == zxDate());
}

TEST(zxdate, texts_worked_out_by_hand) {
  const struct {
    std::int32_t count;
    const char* text;
  } rows[] = {
      {0, "01-01-70"},     {30, "31-01-70"},    {31, "01-02-70"},
      {58, "28-02-70"},    {59, "01-03-70"},    {364, "31-12-70"},
      {365, "01-01-71"},   {789, "29-02-72"},  // 365 + 365 + 31 + 28
      {790, "01-03-72"},   {1095, "31-12-72"},  {1096, "01-01-73"},
      {1460, "31-12-73"},  {1461, "01-01-74"},  {10956, "31-12-99"},
      {10957, "01-01-00"}, {11016, "29-02-00"}, {11017, "01-03-00"},
      {31776, "31-12-56"}, {31777, "01-01-57"}, {k_last_day, "31-12-57"},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(text_of(date_of(row.count)), row.text) << row.count;
  }
}

TEST(zxdate, every_day_is_that_of_the_standard_calendar) {
  ASSERT_EQ(fields_of_count(k_last_day), (Fields{2057, 12, 31}));
  for (std::int32_t count = 0; count <= k_last_day; ++count) {
    const Fields expected = fields_of_count(count);
    ASSERT_EQ(fields_of(date_of(count)), expected) << count;
    ASSERT_EQ(text_of(date_of(count)), text_of_fields(expected)) << count;
  }
}

TEST(zxdate, a_text_written_into_a_buffer_is_eight_bytes_without_a_nul) {
  static_assert(zxDate::k_text_length == 8);
  char room[10] = {'?', '?', '?', '?', '?', '?', '?', '?', '?', '?'};
  EXPECT_TRUE(date_of(14300).write_text(room));
  EXPECT_EQ(std::string(room, sizeof room), "25-02-09??");
}

TEST(zxdate, every_count_outside_of_the_calendar_fails_an_assertion) {
  Fields fields;
  for (std::int32_t count = INT16_MIN; count <= INT16_MAX; ++count) {
    if (is_in_calendar(count)) continue;
    const kit::Failure failure = kit::failure_of([&] {
      date_of(count).get_full(fields.year, fields.month, fields.day);
    });
    ASSERT_TRUE(kit::is_assertion_of(failure, "zxdate")) << count;
    ASSERT_EQ(fields, Fields()) << count;
  }
}

TEST(zxdate, both_texts_of_a_count_outside_of_the_calendar_fail_as_well) {
  char room[zxDate::k_text_length];
  for (const std::int32_t count :
       {INT16_MIN, -1462, -1461, -366, -1, k_last_day + 1, INT16_MAX}) {
    SCOPED_TRACE(count);
    EXPECT_ASSERTION(date_of(count).to_text(), "zxdate");
    EXPECT_ASSERTION(date_of(count).write_text(room), "zxdate");
  }
}

TEST(zxdate, behind_a_dropped_failure_nothing_is_written) {
  kit::with_failures_dropped([] {
    for (std::int32_t count = INT16_MIN; count <= INT16_MAX; ++count) {
      if (is_in_calendar(count)) continue;
      Fields fields;
      char room[zxDate::k_text_length + 1] = "unharmed";
      const zxDate date = date_of(count);
      ASSERT_FALSE(date.get_full(fields.year, fields.month, fields.day));
      ASSERT_EQ(fields, Fields()) << count;
      ASSERT_FALSE(date.write_text(room)) << count;
      ASSERT_STREQ(room, "unharmed") << count;
      ASSERT_EQ(text_of(date), "") << count;
    }
  });
}

// ---- setting

TEST(zxdate, set_worked_out_by_hand) {
  const struct {
    Fields fields;
    const char* text;
  } rows[] = {
      {{99, 12, 31}, "31-12-1999"},   {{0, 1, 1}, "01-01-2000"},
      {{57, 1, 1}, "01-01-2057"},     {{57, 12, 31}, "31-12-2057"},
      {{70, 1, 1}, "01-01-1970"},     {{1970, 1, 1}, "01-01-1970"},
      {{2057, 12, 31}, "31-12-2057"}, {{9, 2, 25}, "25-02-2009"},
      {{4, 2, 29}, "29-02-2004"},     {{5, 2, 29}, "01-03-2005"},
      {{5, 2, 30}, "02-03-2005"},     {{5, 2, 31}, "03-03-2005"},
      {{4, 2, 31}, "02-03-2004"},     {{5, 4, 31}, "01-05-2005"},
      {{2000, 11, 31}, "01-12-2000"},
  };
  for (const auto& row : rows) {
    zxDate date;
    date.set(row.fields.year, row.fields.month, row.fields.day);
    EXPECT_EQ(std::string(zxStr(date.to_text_full()).c_str()), row.text);
  }
}

TEST(zxdate, set_fails_outside_of_its_ranges) {
  const Fields rows[] = {
      {58, 1, 1},
      {69, 1, 1},
      {100, 1, 1},
      {1969, 12, 31},
      {2058, 1, 1},
      {-1, 1, 1},
      {2000, 0, 1},
      {2000, 13, 1},
      {2000, 1, 0},
      {2000, 1, 32},
      {2000, -1, 1},
      {2000, 1, -1},
      {INT32_MIN, 1, 1},
      {INT32_MAX, 1, 1},
      {2000, INT32_MIN, 1},
      {2000, INT32_MAX, 1},
      {2000, 1, INT32_MIN},
      {2000, 1, INT32_MAX},
      {0, 0, 0},
  };
  for (const Fields& row : rows) {
    SCOPED_TRACE(testing::PrintToString(row.year));
    zxDate date = date_of(k_other_day);
    EXPECT_FAILURE(date.set(row.year, row.month, row.day), k_bad_date,
                   k_bad_date_line);
    EXPECT_EQ(date.days(), k_other_day);
  }
}

TEST(zxdate, set_takes_all_years_months_and_days_as_told) {
  kit::with_failures_dropped([] {
    for (std::int32_t year = -30; year <= 2100; ++year) {
      if (year == 130) year = 1870;
      for (std::int32_t month = -1; month <= 14; ++month) {
        for (std::int32_t day = -1; day <= 33; ++day) {
          zxDate date = date_of(k_other_day);
          date.set(year, month, day);
          ASSERT_EQ(date.days(),
                    count_set({year, month, day}).value_or(k_other_day))
              << year << '-' << month << '-' << day;
        }
      }
    }
  });
}

TEST(zxdate, a_day_count_is_set_up_to_the_end_of_2056) {
  zxDate date;
  for (std::int32_t count = 0; count <= 31776; ++count) {
    date.set_days(count);
    ASSERT_EQ(date.days(), count);
  }
  EXPECT_EQ(text_of(date), "31-12-56");
  for (const std::int32_t count :
       {-1, 31777, 32141, 65536, 65537, INT32_MIN, INT32_MAX}) {
    SCOPED_TRACE(count);
    EXPECT_ASSERTION(date.set_days(count), "zxdate");
    kit::with_failures_dropped([&] { date.set_days(count); });
    EXPECT_EQ(date.days(), 31776);
  }
}

TEST(zxdate, the_date_of_a_time_is_its_date) {
  for (std::int32_t count = 1; count <= 24854; ++count) {
    zxDate date;
    date.set_from_time(zxTime::from_stored(count * 86400));
    ASSERT_EQ(date.days(), count);
    date.set_from_time(zxTime::from_stored(count * 86400 + 86399));
    ASSERT_EQ(date.days(), count);
  }
}

TEST(zxdate, the_null_time_has_no_date) {
  zxDate date = date_of(k_other_day);
  EXPECT_FAILURE(date.set_from_time(zxTime()), k_bad_date, k_bad_date_line);
  kit::with_failures_dropped([&] { date.set_from_time(zxTime()); });
  EXPECT_EQ(date.days(), k_other_day);
  EXPECT_ASSERTION(date.set_from_time(zxTime::from_stored(-1)), "zxtime");
}

// Before 1970, and behind the year 3000, there is no local time.
TEST(zxdate, a_moment_without_a_local_time_has_no_date) {
  zxDate date = date_of(k_other_day);
  for (const std::int64_t moment :
       {std::int64_t{0}, std::int64_t{-1}, std::int64_t{INT32_MIN},
        std::int64_t{INT64_MIN}, std::int64_t{INT64_MAX},
        std::int64_t{32'535'216'000}}) {
    EXPECT_FAILURE(date.set_from_time_t(moment), k_bad_date, k_bad_date_line);
    kit::with_failures_dropped([&] { date.set_from_time_t(moment); });
    EXPECT_EQ(date.days(), k_other_day);
  }
}

// ---- fields

TEST(zxdate, every_field_of_every_day) {
  for (std::int32_t count = 0; count <= k_last_day; ++count) {
    const Fields fields = fields_of_count(count);
    const zxDate date = date_of(count);
    Fields short_fields;
    ASSERT_TRUE(
        date.get(short_fields.year, short_fields.month, short_fields.day));
    ASSERT_EQ(short_fields,
              (Fields{fields.year % 100, fields.month, fields.day}));
    ASSERT_EQ(date.year(), fields.year % 100);
    ASSERT_EQ(date.full_year(), fields.year);
    ASSERT_EQ(date.month(), fields.month);
    ASSERT_EQ(date.day(), fields.day);
    const std::chrono::weekday weekday{
        std::chrono::sys_days(std::chrono::days(count))};
    ASSERT_EQ(date.day_of_week(),
              static_cast<std::int32_t>(weekday.c_encoding()));
    ASSERT_EQ(date.days_in_month(), length_of_month(fields.year, fields.month));
    ASSERT_EQ(date.end_of_month().days(),
              count - fields.day + length_of_month(fields.year, fields.month));
  }
}

TEST(zxdate, days_of_the_week_worked_out_by_hand) {
  EXPECT_EQ(date_of(0).day_of_week(), 4);  // Thursday
  EXPECT_EQ(date_of(2).day_of_week(), 6);
  EXPECT_EQ(date_of(3).day_of_week(), 0);
  EXPECT_EQ(date_of(-1).day_of_week(), 3);
  EXPECT_EQ(date_of(-4).day_of_week(), 0);
  EXPECT_EQ(date_of(-5).day_of_week(), 6);
  static_assert(zxDate().day_of_week() == 4);
}

TEST(zxdate, every_count_has_a_day_of_the_week) {
  for (std::int32_t count = INT16_MIN; count <= INT16_MAX; ++count) {
    const std::chrono::weekday weekday{
        std::chrono::sys_days(std::chrono::days(count))};
    ASSERT_EQ(date_of(count).day_of_week(),
              static_cast<std::int32_t>(weekday.c_encoding()))
        << count;
  }
}

TEST(zxdate, the_end_of_the_last_month_is_beyond_the_range_of_counts) {
  EXPECT_EQ(date_of(32141 - 30).end_of_month().days(), 32141);
  EXPECT_EQ(text_of(date_of(31777).end_of_month()), "31-01-57");
}

TEST(zxdate, questions_to_a_date_outside_of_the_calendar_fail) {
  Fields fields;
  for (const std::int32_t count : {INT16_MIN, -1, k_last_day + 1, INT16_MAX}) {
    SCOPED_TRACE(count);
    const zxDate date = date_of(count);
    EXPECT_ASSERTION(date.get(fields.year, fields.month, fields.day), "zxdate");
    EXPECT_ASSERTION(date.year(), "zxdate");
    EXPECT_ASSERTION(date.full_year(), "zxdate");
    EXPECT_ASSERTION(date.month(), "zxdate");
    EXPECT_ASSERTION(date.day(), "zxdate");
    EXPECT_ASSERTION(date.days_in_month(), "zxdate");
    EXPECT_ASSERTION(date.end_of_month(), "zxdate");
    EXPECT_ASSERTION(date.to_text_full(), "zxdate");
    kit::with_failures_dropped([&] {
      EXPECT_FALSE(date.get(fields.year, fields.month, fields.day));
      EXPECT_EQ(fields, Fields());
      EXPECT_EQ(date.year(), 0);
      EXPECT_EQ(date.full_year(), 0);
      EXPECT_EQ(date.month(), 0);
      EXPECT_EQ(date.day(), 0);
      EXPECT_EQ(date.days_in_month(), 0);
      EXPECT_EQ(date.end_of_month(), date);
      EXPECT_TRUE(date.to_text_full().is_empty());
    });
  }
}

TEST(zxdate, changes_of_a_date_outside_of_the_calendar_fail) {
  for (const std::int32_t count : {INT16_MIN, -1, k_last_day + 1, INT16_MAX}) {
    SCOPED_TRACE(count);
    zxDate date = date_of(count);
    EXPECT_ASSERTION(date.set_day(1), "zxdate");
    EXPECT_ASSERTION(date.set_month(1), "zxdate");
    EXPECT_ASSERTION(date.set_year(2000), "zxdate");
    EXPECT_ASSERTION(date.add_months(1), "zxdate");
    kit::with_failures_dropped([&] {
      date.set_day(1);
      date.set_month(1);
      date.set_year(2000);
      date.add_months(1);
    });
    EXPECT_EQ(date.days(), count);
  }
}

TEST(zxdate, dates_are_in_the_order_of_their_counts) {
  const std::int32_t counts[] = {INT16_MIN, -1, 0, 1, 31776, INT16_MAX};
  for (const std::int32_t a : counts) {
    for (const std::int32_t b : counts) {
      EXPECT_EQ(date_of(a) < date_of(b), a < b);
      EXPECT_EQ(date_of(a) <= date_of(b), a <= b);
      EXPECT_EQ(date_of(a) > date_of(b), a > b);
      EXPECT_EQ(date_of(a) >= date_of(b), a >= b);
      EXPECT_EQ(date_of(a) == date_of(b), a == b);
      EXPECT_EQ(date_of(a) != date_of(b), a != b);
    }
  }
  static_assert(zxDate::from_stored(1) > zxDate());
}

// ---- changing one field

TEST(zxdate, set_day_takes_the_days_of_the_month) {
  kit::with_failures_dropped([] {
    for (std::int32_t count = 0; count <= k_last_day; ++count) {
      const Fields fields = fields_of_count(count);
      const std::int32_t length = length_of_month(fields.year, fields.month);
      for (std::int32_t day = -1; day <= 33; ++day) {
        zxDate date = date_of(count);
        date.set_day(day);
        const bool is_day = day >= 1 && day <= length;
        ASSERT_EQ(date.days(), is_day ? count - fields.day + day : count);
      }
    }
  });
}

TEST(zxdate, set_month_lowers_the_day) {
  kit::with_failures_dropped([] {
    for (std::int32_t count = 0; count <= k_last_day; ++count) {
      const Fields fields = fields_of_count(count);
      for (std::int32_t month = -1; month <= 14; ++month) {
        zxDate date = date_of(count);
        date.set_month(month);
        std::int32_t expected = count;
        if (month >= 1 && month <= 12)
          expected = *count_of_fields(
              {fields.year, month,
               std::min(fields.day, length_of_month(fields.year, month))});
        ASSERT_EQ(date.days(), expected) << count << " month " << month;
      }
    }
  });
}

TEST(zxdate, set_year_lowers_the_day) {
  for (std::int32_t count = 0; count <= k_last_day; ++count) {
    const Fields fields = fields_of_count(count);
    for (std::int32_t year = 1970; year <= 2057; ++year) {
      const std::int32_t expected = *count_of_fields(
          {year, fields.month,
           std::min(fields.day, length_of_month(year, fields.month))});
      zxDate date = date_of(count);
      date.set_year(year);
      ASSERT_EQ(date.days(), expected) << count << " year " << year;
    }
  }
}

TEST(zxdate, set_year_takes_two_digits_as_set_does) {
  zxDate leap_day;
  leap_day.set(2004, 2, 29);
  for (std::int32_t year = -10; year <= 2070; ++year) {
    const std::int32_t full = year >= 0 && year <= 57    ? year + 2000
                              : year >= 70 && year <= 99 ? year + 1900
                                                         : year;
    zxDate date = leap_day;
    kit::with_failures_dropped([&] { date.set_year(year); });
    if (full < 1970 || full > 2057) {
      ASSERT_EQ(date, leap_day) << year;
    } else {
      ASSERT_EQ(fields_of(date), (Fields{full, 2, full % 4 == 0 ? 29 : 28}));
    }
  }
}

TEST(zxdate, a_bad_field_fails) {
  zxDate date;
  date.set(2005, 2, 28);
  for (const std::int32_t day : {INT32_MIN, -1, 0, 29, INT32_MAX})
    EXPECT_ASSERTION(date.set_day(day), "zxdate");
  for (const std::int32_t month : {INT32_MIN, -1, 0, 13, INT32_MAX})
    EXPECT_ASSERTION(date.set_month(month), "zxdate");
  for (const std::int32_t year :
       {INT32_MIN, -1, 58, 69, 100, 1969, 2058, INT32_MAX})
    EXPECT_FAILURE(date.set_year(year), k_bad_date, k_bad_date_line);
  EXPECT_EQ(text_of(date), "28-02-05");
}

// ---- reckoning

TEST(zxdate, days_are_added_within_the_range_of_counts) {
  kit::with_failures_dropped([] {
    for (std::int32_t count = 0; count <= k_last_day; ++count) {
      for (const std::int32_t n : {0,
                                   1,
                                   -1,
                                   7,
                                   -7,
                                   31,
                                   -31,
                                   365,
                                   -366,
                                   1461,
                                   -1461,
                                   20000,
                                   -20000,
                                   31776 - count,
                                   31777 - count,
                                   -count,
                                   -count - 1,
                                   65536,
                                   -65536,
                                   INT32_MAX,
                                   INT32_MAX - count,
                                   INT32_MIN}) {
        zxDate date = date_of(count);
        date.add_days(n);
        const std::int64_t sum = std::int64_t{count} + n;
        ASSERT_EQ(date.days(), sum >= 0 && sum <= 31776 ? sum : count)
            << count << " + " << n;
      }
    }
  });
}

TEST(zxdate, days_added_beyond_the_range_fail_an_assertion) {
  EXPECT_EQ(changed(31775, [](zxDate& date) { date.add_days(1); }), 31776);
  zxDate date = date_of(31776);
  EXPECT_ASSERTION(date.add_days(1), "zxdate");
  EXPECT_ASSERTION(date.add_days(INT32_MAX), "zxdate");
  EXPECT_ASSERTION(date.add_days(INT32_MIN), "zxdate");
  EXPECT_EQ(date.days(), 31776);
  // A date beyond the range can come back into it.
  EXPECT_EQ(changed(32141, [](zxDate& d) { d.add_days(-365); }), 31776);
  EXPECT_EQ(changed(-1, [](zxDate& d) { d.add_days(1); }), 0);
}

// The rule step by step.
std::optional<std::int32_t> months_added(std::int32_t count, std::int32_t n) {
  Fields fields = fields_of_count(count);
  while (n < 0) {
    --fields.year;
    n += 12;
  }
  const std::int32_t month = n + fields.month - 1;
  return count_set({fields.year + month / 12, month % 12 + 1, fields.day});
}

TEST(zxdate, months_added_worked_out_by_hand) {
  const struct {
    Fields from;
    std::int32_t n;
    const char* text;
  } rows[] = {
      {{2005, 1, 31}, 1, "03-03-05"},   {{2004, 1, 31}, 1, "02-03-04"},
      {{2005, 3, 31}, 1, "01-05-05"},   {{2005, 3, 31}, -1, "03-03-05"},
      {{2005, 3, 31}, -13, "02-03-04"}, {{2004, 2, 29}, 12, "01-03-05"},
      {{2005, 1, 15}, 0, "15-01-05"},   {{2005, 12, 15}, 1, "15-01-06"},
      {{2005, 1, 15}, -1, "15-12-04"},  {{2005, 1, 15}, -12, "15-01-04"},
      {{1970, 1, 1}, 1055, "01-12-57"}, {{2057, 12, 31}, -1055, "31-01-70"},
  };
  for (const auto& row : rows) {
    zxDate date;
    date.set(row.from.year, row.from.month, row.from.day);
    date.add_months(row.n);
    EXPECT_EQ(text_of(date), row.text);
  }
}

TEST(zxdate, months_are_added_to_every_day) {
  kit::with_failures_dropped([] {
    for (std::int32_t count = 0; count <= k_last_day; ++count) {
      for (const std::int32_t n :
           {-25, -24, -13, -12, -11, -2, -1, 0, 1, 2, 11, 12, 13, 25}) {
        zxDate date = date_of(count);
        date.add_months(n);
        ASSERT_EQ(date.days(), months_added(count, n).value_or(count))
            << count << " + " << n;
      }
    }
  });
}

// Also far out of the calendar, where the year may pass for one of two
// digits.
TEST(zxdate, any_number_of_months_is_added) {
  kit::with_failures_dropped([] {
    for (const std::int32_t count : {0, 30, 59, 364, 10956, 11016, 32141}) {
      for (std::int32_t n = -26000; n <= 2000; ++n) {
        zxDate date = date_of(count);
        date.add_months(n);
        ASSERT_EQ(date.days(), months_added(count, n).value_or(count))
            << count << " + " << n;
      }
    }
  });
  // 2000 less 1950 years is the year 50, which set() takes for 2050.
  EXPECT_EQ(changed(10957, [](zxDate& date) { date.add_months(-1950 * 12); }),
            count_of_fields({2050, 1, 1}));
}

TEST(zxdate, months_beyond_the_calendar_are_a_bad_date) {
  zxDate date = date_of(11000);  // 2000-02-13
  for (const std::int32_t n : {INT32_MIN, INT32_MIN + 1, -2'000'000'000, -400,
                               700, 2'000'000'000, INT32_MAX - 1, INT32_MAX}) {
    EXPECT_FAILURE(date.add_months(n), k_bad_date, k_bad_date_line);
    kit::with_failures_dropped([&] { date.add_months(n); });
    EXPECT_EQ(date.days(), 11000);
  }
}

std::int32_t weekend_days_walked(std::int32_t from, std::int32_t to) {
  std::int32_t found = 0;
  for (std::int32_t day = from; day <= to; ++day) {
    const std::chrono::weekday weekday{
        std::chrono::sys_days(std::chrono::days(day))};
    if (weekday == std::chrono::Friday || weekday == std::chrono::Saturday)
      ++found;
  }
  return found;
}

TEST(zxdate, weekend_days_worked_out_by_hand) {
  // Day 0 is a Thursday.
  EXPECT_EQ(date_of(0).count_weekend_days(date_of(0)), 0);
  EXPECT_EQ(date_of(0).count_weekend_days(date_of(1)), 1);
  EXPECT_EQ(date_of(1).count_weekend_days(date_of(1)), 1);
  EXPECT_EQ(date_of(0).count_weekend_days(date_of(2)), 2);
  EXPECT_EQ(date_of(2).count_weekend_days(date_of(7)), 1);
  EXPECT_EQ(date_of(2).count_weekend_days(date_of(8)), 2);
  EXPECT_EQ(date_of(8).count_weekend_days(date_of(2)), 0);
  EXPECT_EQ(date_of(0).count_weekend_days(date_of(699)), 200);
}

TEST(zxdate, weekend_days_are_those_met_on_the_way) {
  for (const std::int32_t start : {0, 10957, 32100, -32768, -5}) {
    for (std::int32_t from = start; from < start + 15; ++from) {
      for (std::int32_t to = start; to < start + 40; ++to) {
        ASSERT_EQ(date_of(from).count_weekend_days(date_of(to)),
                  weekend_days_walked(from, to))
            << from << " to " << to;
      }
    }
  }
  for (std::int32_t from = 0; from < 8; ++from)
    for (const std::int32_t to : {INT16_MIN, 1000, 31776, 32141, INT16_MAX})
      ASSERT_EQ(date_of(from).count_weekend_days(date_of(to)),
                weekend_days_walked(from, to));
  EXPECT_EQ(date_of(INT16_MIN).count_weekend_days(date_of(INT16_MAX)),
            weekend_days_walked(INT16_MIN, INT16_MAX));
}

// ---- text

TEST(zxdate, a_full_text_has_all_four_digits) {
  EXPECT_STREQ(zxDate().to_text_full().c_str(), "01-01-1970");
  for (std::int32_t count = 0; count <= k_last_day; ++count) {
    const Fields fields = fields_of_count(count);
    char text[40];
    std::snprintf(text, sizeof text, "%.2d-%.2d-%.4d",
                  static_cast<int>(fields.day), static_cast<int>(fields.month),
                  static_cast<int>(fields.year));
    const zxStr found = date_of(count).to_text_full();
    ASSERT_EQ(std::string(found.view()), text) << count;
  }
}

// What parse() leaves: a count, or none if it said false.
std::optional<std::int32_t> parsed(const std::string& text) {
  zxDate date = date_of(k_other_day);
  if (date.parse(text.c_str())) return date.days();
  EXPECT_EQ(date.days(), k_other_day) << text;
  return {};
}

std::string text_in(std::optional<std::int32_t> count) {
  return count ? std::string(zxStr(date_of(*count).to_text_full()).c_str())
               : "no";
}

TEST(zxdate, texts_that_are_dates_and_such_that_are_not) {
  const struct {
    const char* text;
    const char* result;
  } rows[] = {
      {"25/02/09", "25-02-2009"},
      {"25.02.09", "25-02-2009"},
      {"25-02-09", "25-02-2009"},
      {"25-2-2009", "25-02-2009"},
      {"1/2/3", "01-02-2003"},
      {"0000001/002/0003", "01-02-2003"},
      {"31/04/05", "no"},
      {"30/04/05", "30-04-2005"},
      {"31/06/05", "no"},
      {"31/09/05", "no"},
      {"31/11/05", "no"},
      {"29.2.04", "29-02-2004"},
      {"29.2.05", "no"},
      {"30.2.04", "no"},
      {"28.2.05", "28-02-2005"},
      {"1-2/03", "no"},
      {"1/2-03", "no"},
      {"1.2/03", "no"},
      {"1,2,03", "no"},
      {"1 2 03", "no"},
      {"1:2:03", "no"},
      {"010203", "no"},
      {"", "no"},
      {" ", "no"},
      {"1", "no"},
      {"1/", "no"},
      {"1/2", "no"},
      {"/", "no"},
      {"//", "no"},
      {"//5", "no"},
      {"1//05", "no"},
      {"/2/05", "no"},
      {"x", "no"},
      {"x1/2/03", "no"},
      {"1x/2/03", "no"},
      {"1/2x/03", "no"},
      // Digits that are missing count as 0.
      {"1/2/", "01-02-2000"},
      {"1/2/x", "01-02-2000"},
      {"1/2//", "01-02-2000"},
      // Nothing behind the year is looked at.
      {"1/2/03x", "01-02-2003"},
      {"1/2/03/04", "01-02-2003"},
      {"1/2/03 04:05:06", "01-02-2003"},
      {"1/2/03 ", "01-02-2003"},
      {"1/2/3.9", "01-02-2003"},
      // White space and signs.
      {" 1/2/03", "no"},
      {"+1/2/03", "no"},
      {"-1/2/03", "no"},
      {"1 /2/03", "no"},
      {"1/ 2/03", "no"},
      {"1/+2/03", "no"},
      {"1/-2/03", "no"},
      {"1/2 /03", "no"},
      {"1/2/ 03", "01-02-2003"},
      {"1/2/\t\n\v\f\r 03", "01-02-2003"},
      {"1/2/+03", "01-02-2003"},
      {"1/2/ +03", "01-02-2003"},
      {"1/2/+ 03", "01-02-2000"},
      {"1/2/++03", "01-02-2000"},
      {"1/2/-0", "01-02-2000"},
      {"1/2/-3", "no"},
      {"1-2--3", "no"},
      {"1--2-3", "no"},
      // The window of years.
      {"1/1/0", "01-01-2000"},
      {"1/1/57", "01-01-2057"},
      {"31/12/57", "31-12-2057"},
      {"1/1/58", "no"},
      {"1/1/69", "no"},
      {"1/1/70", "01-01-1970"},
      {"1/1/99", "01-01-1999"},
      {"1/1/100", "01-01-2000"},
      {"1/1/101", "no"},
      {"31/12/1969", "no"},
      {"1/1/1970", "01-01-1970"},
      {"31/12/2057", "31-12-2057"},
      {"1/1/2058", "no"},
      // Numbers that no integer holds; wrapped they would be 1, 1 and 2003.
      {"4294967297/1/03", "no"},
      {"18446744073709551617/1/03", "no"},
      {"1/4294967297/03", "no"},
      {"1/1/4294969299", "no"},
      {"1/1/2147483647", "no"},
      {"1/1/2147483648", "no"},
      {"1/1/-2147483648", "no"},
      {"1/1/99999999999999999999999999999999999999999999", "no"},
      {"99999999999999999999999999999999999999999999/1/1", "no"},
      {"1/1/00000000000000000000000000000000000000000003", "01-01-2003"},
      {"\xB2/1/03", "no"},
      {"1/1/\xB2", "01-01-2000"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(text_in(parsed(row.text)), row.result) << row.text;
}

TEST(zxdate, null_text_is_no_date) {
  zxDate date = date_of(k_other_day);
  EXPECT_FALSE(date.parse(static_cast<const char*>(nullptr)));
  EXPECT_EQ(date.days(), k_other_day);
}

TEST(zxdate, a_string_is_parsed_up_to_a_nul) {
  zxDate date;
  EXPECT_TRUE(date.parse(zxStr("25/02/09")));
  EXPECT_EQ(text_of(date), "25-02-09");
  EXPECT_TRUE(
      date.parse(zxStr("1/2/3\0"
                       "4",
                       7)));
  EXPECT_EQ(text_of(date), "01-02-03");
  EXPECT_FALSE(date.parse(zxStr()));
}

TEST(zxdate, all_days_months_and_years_are_parsed_as_told) {
  for (std::int32_t year = 0; year <= 2070; ++year) {
    if (year == 120) year = 1960;
    std::int32_t full = year;
    if (year <= 57) full = year + 2000;
    if (year >= 70 && year <= 100) full = year + 1900;
    const bool is_year = full >= 1970 && full <= 2057;
    for (std::int32_t month = 0; month <= 14; ++month) {
      for (std::int32_t day = 0; day <= 33; ++day) {
        char text[40];
        const char separator = "/.-"[day % 3];
        std::snprintf(text, sizeof text,
                      year % 2 == 0 ? "%d%c%d%c%d" : "%.2d%c%.2d%c%.3d",
                      static_cast<int>(day), separator, static_cast<int>(month),
                      separator, static_cast<int>(year));
        std::optional<std::int32_t> expected;
        if (is_year) expected = count_of_fields({full, month, day});
        ASSERT_EQ(parsed(text), expected) << text;
      }
    }
  }
}

TEST(zxdate, any_byte_but_three_is_no_separator) {
  for (int byte = 0; byte < 256; ++byte) {
    const char c = static_cast<char>(byte);
    const bool is_separator = c == '/' || c == '.' || c == '-';
    const std::string text = std::string("5") + c + "6" + c + "7";
    EXPECT_EQ(text_in(parsed(text)), is_separator ? "05-06-2007" : "no")
        << byte;
    const std::string mixed = std::string("5/6") + c + "7";
    EXPECT_EQ(text_in(parsed(mixed)), c == '/' ? "05-06-2007" : "no") << byte;
  }
}

// Each text ends at the end of the memory that can be read.
TEST(zxdate, no_byte_behind_the_end_of_a_text_is_read) {
  const kit::GuardedMemory memory(100);
  for (const char* whole :
       {"25/02/09", "1.2.3 ", "1-2-+", "1-2-  ", "-", " ", "+", "/", "//",
        "1//", "99999999999/1/1", "1/99999999999/1", "1/1/99999999999"}) {
    for (std::size_t length = 0; length <= std::strlen(whole); ++length) {
      char* const text = memory.end() - length - 1;
      std::memcpy(text, whole, length);
      text[length] = '\0';
      zxDate at_the_end = date_of(k_other_day);
      const bool found = at_the_end.parse(text);
      const std::optional<std::int32_t> elsewhere =
          parsed(std::string(whole, length));
      EXPECT_EQ(found, elsewhere.has_value());
      EXPECT_EQ(at_the_end.days(), elsewhere.value_or(k_other_day));
    }
  }
}

}  // namespace
