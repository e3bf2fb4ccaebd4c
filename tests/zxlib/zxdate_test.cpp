// zxdate_test.cpp - calendar dates: every day of the calendar against the
// standard library's, the counts outside of it, and the texts.
// Tests zxlib/zxdate.h and zxdate.cpp.
#include "zxdate.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <string>

#include "kit/failure.h"

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

}  // namespace
