// zxdate.cpp - calendar dates.
// Tests: tests/zxlib/zxdate_test.cpp.
#include "zxdate.h"

#include <array>

namespace {

constexpr std::int32_t k_first_year = 1970;
constexpr std::int32_t k_last_year = 2057;
constexpr std::int32_t k_days_of_four_years = 1461;

// Days ahead of each month of a common year.
constexpr std::int32_t k_days_before_month[12] = {0,   31,  59,  90,  120, 151,
                                                  181, 212, 243, 273, 304, 334};

constexpr bool is_leap(std::int32_t year) { return year % 4 == 0; }

constexpr std::int32_t days_of_year(std::int32_t year) {
  return is_leap(year) ? 366 : 365;
}

// Days ahead of month 0 to 11 of a year.
constexpr std::int32_t month_start(std::int32_t month, bool leap) {
  return k_days_before_month[month] + (leap && month >= 2 ? 1 : 0);
}

// A day of the four years that begin with 1970, 1974 and so on.
struct CycleDay {
  std::uint8_t year;   // 0 to 3
  std::uint8_t month;  // 1 to 12
  std::uint8_t day;    // from 1
};

constexpr CycleDay cycle_day(std::int32_t rest) {
  std::int32_t year = 0;
  for (; rest >= days_of_year(k_first_year + year); ++year)
    rest -= days_of_year(k_first_year + year);
  const bool leap = is_leap(k_first_year + year);
  std::int32_t month = 11;
  while (rest < month_start(month, leap)) --month;
  return {static_cast<std::uint8_t>(year), static_cast<std::uint8_t>(month + 1),
          static_cast<std::uint8_t>(rest - month_start(month, leap) + 1)};
}

constexpr auto make_cycle() {
  std::array<CycleDay, k_days_of_four_years> cycle{};
  for (std::int32_t i = 0; i < k_days_of_four_years; ++i)
    cycle[static_cast<std::size_t>(i)] = cycle_day(i);
  return cycle;
}
constexpr auto k_cycle = make_cycle();

void put_two_digits(char* out, std::int32_t value) {
  out[0] = static_cast<char>('0' + value / 10);
  out[1] = static_cast<char>('0' + value % 10);
}

}  // namespace

bool zxDate::get_full(std::int32_t& year, std::int32_t& month,
                      std::int32_t& day) const {
  std::int32_t rest = count % k_days_of_four_years;
  std::int32_t start = k_first_year + 4 * (count / k_days_of_four_years);
  if (rest < 0) {
    rest += k_days_of_four_years;
    start -= 4;
  }
  const CycleDay& found = k_cycle[static_cast<std::size_t>(rest)];
  const std::int32_t y = start + found.year;
  if (!ZX_ASSERT(y >= k_first_year && y <= k_last_year)) return false;
  year = y;
  month = found.month;
  day = found.day;
  return true;
}

bool zxDate::write_text(char* out) const {
  std::int32_t year = 0;
  std::int32_t month = 0;
  std::int32_t day = 0;
  if (!get_full(year, month, day)) return false;
  put_two_digits(out, day);
  out[2] = '-';
  put_two_digits(out + 3, month);
  out[5] = '-';
  put_two_digits(out + 6, year % 100);
  return true;
}

zxStr zxDate::to_text() const {
  char text[k_text_length];
  if (!write_text(text)) return {};
  return {text, k_text_length};
}
