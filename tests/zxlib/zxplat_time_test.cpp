// zxplat_time_test.cpp - the local clock of the platform line: the moments
// that it knows, and, in processes of their own, zones east and west, with
// and without daylight saving.
// Tests zxlib/zxplat.h, zxplat_posix_time.cpp and zxplat_win32_time.cpp.

#include <gtest/gtest.h>

#include <chrono>
#include <climits>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <string>
#include <vector>

#include "kit/cases.h"
#include "zones.h"
#include "zxplat.h"

namespace {

using zxplat::k_last_moment;
using zxplat::last_error;
using zxplat::local_time;
using zxplat::set_last_error;
using zxplat::standard_zone_offset;

constexpr int k_untouched = 4711;
constexpr std::int64_t k_day = 86400;

std::string text_of(const std::tm& fields) {
  char text[100];
  std::snprintf(text, sizeof text, "%d-%d-%d %d:%d:%d, %d, %d, %s",
                fields.tm_year + 1900, fields.tm_mon + 1, fields.tm_mday,
                fields.tm_hour, fields.tm_min, fields.tm_sec, fields.tm_wday,
                fields.tm_yday, fields.tm_isdst > 0 ? "summer" : "winter");
  return text;
}

// The same of a clock that is some seconds ahead of UTC.
std::string text_at(std::int64_t moment, std::int64_t ahead, bool summer) {
  const std::chrono::sys_seconds time{std::chrono::seconds(moment + ahead)};
  const auto day = std::chrono::floor<std::chrono::days>(time);
  const std::chrono::year_month_day date(day);
  const std::chrono::hh_mm_ss clock(time - day);
  std::tm fields = {};
  fields.tm_year = static_cast<int>(date.year()) - 1900;
  fields.tm_mon = static_cast<int>(static_cast<unsigned>(date.month())) - 1;
  fields.tm_mday = static_cast<int>(static_cast<unsigned>(date.day()));
  fields.tm_hour = static_cast<int>(clock.hours().count());
  fields.tm_min = static_cast<int>(clock.minutes().count());
  fields.tm_sec = static_cast<int>(clock.seconds().count());
  const std::chrono::sys_days new_year{date.year() / 1 / 1};
  fields.tm_wday = static_cast<int>(std::chrono::weekday(day).c_encoding());
  fields.tm_yday = static_cast<int>((day - new_year).count());
  fields.tm_isdst = summer ? 1 : 0;
  return text_of(fields);
}

// ---- any zone

TEST(zxplat_time, a_moment_outside_of_its_range_has_no_fields) {
  for (const std::int64_t moment :
       {std::int64_t{-1}, std::int64_t{INT32_MIN}, std::int64_t{INT64_MIN},
        k_last_moment + 1, std::int64_t{INT64_MAX}}) {
    std::tm fields;
    std::memset(&fields, 0x55, sizeof fields);
    std::tm before;
    std::memset(&before, 0x55, sizeof before);
    set_last_error(0);
    EXPECT_FALSE(local_time(moment, fields)) << moment;
    EXPECT_EQ(last_error(), zxplat::k_err_bad_parameter);
    EXPECT_EQ(std::memcmp(&fields, &before, sizeof fields), 0);
  }
}

TEST(zxplat_time, the_first_and_the_last_moment_have_fields) {
  std::tm fields = {};
  set_last_error(k_untouched);
  EXPECT_TRUE(local_time(0, fields));
  EXPECT_TRUE(fields.tm_year == 70 || fields.tm_year == 69);
  EXPECT_TRUE(local_time(k_last_moment, fields));
  EXPECT_TRUE(fields.tm_year == 1100 || fields.tm_year == 1101);
  standard_zone_offset();
  EXPECT_EQ(last_error(), k_untouched);
}

// ---- zones, in processes of their own

// Winters all over the calendar, and one summer, in which all zones that
// save daylight do so, whosever rules are taken.
constexpr std::int64_t k_winters[] = {1, k_day, 946'684'800, 1'230'768'000,
                                      2'114'380'800};
constexpr std::int64_t k_summer = 1'246'449'600;  // 2009-07-01 12:00 UTC

void say(const std::string& line) {
  zxplat::write_all(zxplat::k_stdout_fd, line + "\n");
}

void say_time(std::int64_t moment) {
  std::tm fields = {};
  say(local_time(moment, fields) ? text_of(fields) : "none");
}

ZX_CASE(zxplat_time_in_zone) {
  zxplat::set_binary(zxplat::k_stdout_fd);
  say(std::to_string(standard_zone_offset()));
  for (const std::int64_t winter : k_winters) say_time(winter);
  say_time(k_summer);
  // The rules of later years must not change the offset.
  std::tm fields = {};
  local_time(2'200'000'000, fields);
  say(std::to_string(standard_zone_offset()));
  return 0;
}

std::vector<std::string> lines_of(const std::string& text) {
  std::vector<std::string> lines;
  std::size_t start = 0;
  for (std::size_t end; (end = text.find('\n', start)) != std::string::npos;
       start = end + 1)
    lines.push_back(text.substr(start, end - start));
  return lines;
}

std::vector<std::string> expected_in(const Zone& zone) {
  std::vector<std::string> lines = {std::to_string(zone.behind)};
  for (const std::int64_t winter : k_winters)
    lines.push_back(text_at(winter, -zone.behind, false));
  const std::int64_t ahead = -zone.behind + (zone.saves_daylight ? 3600 : 0);
  lines.push_back(text_at(k_summer, ahead, zone.saves_daylight));
  lines.push_back(std::to_string(zone.behind));
  return lines;
}

TEST(zxplat_time, the_zone_is_that_of_the_environment) {
  for (const Zone& zone : k_zones) {
    SCOPED_TRACE(zone.name);
    kit::ProcessOptions options;
    options.variables = {{"TZ", zone.name}};
    const kit::ProcessResult result =
        kit::run_case("zxplat_time_in_zone", {}, options);
    EXPECT_EQ(result.exit_code, 0);
    EXPECT_EQ(lines_of(result.out), expected_in(zone));
  }
}

}  // namespace
