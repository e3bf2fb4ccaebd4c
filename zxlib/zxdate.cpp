// zxdate.cpp - calendar dates.
// Tests: tests/zxlib/zxdate_test.cpp.
#include "zxdate.h"

#include <algorithm>
#include <array>
#include <string_view>

#include "zxplat.h"
#include "zxtime.h"

using zxdate_detail::DateFields;
using zxdate_detail::is_between;
using zxdate_detail::k_first_year;

namespace {

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

// The year that a number of up to two digits stands for; `last` is the last
// number of the older century.
constexpr std::int32_t year_in_full(std::int32_t year, std::int32_t last) {
  if (year >= 0 && year <= 57) return year + 2000;
  if (year >= 70 && year <= last) return year + 1900;
  return year;
}

// The day count of fields in their ranges; a day beyond its month is one of
// the next.
constexpr std::int32_t count_of(const DateFields& date) {
  const std::int32_t year_start =
      (date.year - k_first_year) * 365 + (date.year - 1) / 4 - 492;
  return year_start + month_start(date.month - 1, is_leap(date.year)) +
         date.day - 1;
}
static_assert(count_of({2057, 12, 31}) == 32141);

// All 0 for a date outside the calendar.
DateFields fields_of(zxDate date) {
  DateFields fields = {0, 0, 0};
  date.get_full(fields.year, fields.month, fields.day);
  return fields;
}

void put_two_digits(char* out, std::int32_t value) {
  out[0] = static_cast<char>('0' + value / 10);
  out[1] = static_cast<char>('0' + value % 10);
}

}  // namespace

// ---- what times go by as well

namespace zxdate_detail {

std::int32_t parsed_year(std::int32_t year) { return year_in_full(year, 100); }

std::int32_t days_of_month(std::int32_t year, std::int32_t month) {
  constexpr std::int32_t k_days[12] = {31, 28, 31, 30, 31, 30,
                                       31, 31, 30, 31, 30, 31};
  return k_days[month - 1] + (month == 2 && is_leap(year) ? 1 : 0);
}

bool is_day(const DateFields& date) {
  return is_between(1, date.month, 12) &&
         is_between(1, date.day, days_of_month(date.year, date.month));
}

bool read_number(const char*& at, std::int32_t& number) {
  const char* digit = at;
  while (zx_is_space(*digit)) ++digit;
  const bool is_negative = *digit == '-';
  if (is_negative || *digit == '+') ++digit;
  std::int64_t value = 0;
  for (; zx_is_digit(*digit); ++digit) {
    value = value * 10 + (*digit - '0');
    if (value > INT32_MAX) return false;
  }
  number = static_cast<std::int32_t>(is_negative ? -value : value);
  while (zx_is_digit(*at)) ++at;
  return true;
}

const char* read_date(const char* at, DateFields& date) {
  constexpr std::string_view k_separators = "/.-";
  if (!read_number(at, date.day)) return nullptr;
  const char separator = *at;
  if (k_separators.find(separator) == k_separators.npos) return nullptr;
  if (!read_number(++at, date.month) || *at != separator) return nullptr;
  if (!read_number(++at, date.year)) return nullptr;
  date.year = parsed_year(date.year);
  return at;
}

std::int32_t weekend_days(std::int32_t first, std::int32_t last) {
  // Days ahead of one, counted from a Sunday, that fall on day 5 or 6.
  const auto ahead_of = [](std::int32_t day) {
    const std::int32_t since_sunday = day + k_days_to_sunday;
    return since_sunday / 7 * 2 + std::max(since_sunday % 7 - 5, 0);
  };
  return first > last ? 0 : ahead_of(last + 1) - ahead_of(first);
}

}  // namespace zxdate_detail

// ---- setting

zxDate zxDate::today() {
  zxDate date;
  date.set_from_time_t(zxplat::process.clock());
  return date;
}

void zxDate::set(std::int32_t year, std::int32_t month, std::int32_t day) {
  const DateFields date = {year_in_full(year, 99), month, day};
  if (is_between(k_first_year, date.year, k_last_year) &&
      is_between(1, month, 12) && is_between(1, day, 31))
    count = static_cast<std::int16_t>(count_of(date));
  else
    bail_code(1801);
}

void zxDate::set_days(std::int32_t days_since_1970) {
  if (!ZX_ASSERT(is_between(0, days_since_1970, k_last_days))) return;
  count = static_cast<std::int16_t>(days_since_1970);
}

void zxDate::set_from_time_t(std::int64_t moment) {
  const std::tm clock = local_fields(moment);
  set(clock.tm_year + 1900, clock.tm_mon + 1, clock.tm_mday);
}

void zxDate::set_from_time(zxTime time) {
  DateFields date;
  time.get_date(date.year, date.month, date.day);
  set(date.year, date.month, date.day);
}

bool zxDate::parse(const char* text) {
  DateFields date;
  if (text == nullptr || zxdate_detail::read_date(text, date) == nullptr ||
      !is_between(k_first_year, date.year, k_last_year) ||
      !zxdate_detail::is_day(date))
    return false;
  count = static_cast<std::int16_t>(count_of(date));
  return true;
}

// ---- fields

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

bool zxDate::get(std::int32_t& year, std::int32_t& month,
                 std::int32_t& day) const {
  if (!get_full(year, month, day)) return false;
  year %= 100;
  return true;
}

std::int32_t zxDate::year() const { return full_year() % 100; }

std::int32_t zxDate::full_year() const { return fields_of(*this).year; }

std::int32_t zxDate::month() const { return fields_of(*this).month; }

std::int32_t zxDate::day() const { return fields_of(*this).day; }

std::int32_t zxDate::days_in_month() const {
  DateFields date;
  if (!get_full(date.year, date.month, date.day)) return 0;
  return zxdate_detail::days_of_month(date.year, date.month);
}

// ---- reckoning

zxDate zxDate::end_of_month() const {
  DateFields date;
  if (!get_full(date.year, date.month, date.day)) return *this;
  date.day = zxdate_detail::days_of_month(date.year, date.month);
  return from_stored(static_cast<std::int16_t>(count_of(date)));
}

void zxDate::add_days(std::int32_t n) {
  const std::int64_t sum = std::int64_t{count} + n;
  if (!ZX_ASSERT(sum >= 0 && sum <= k_last_days)) return;
  count = static_cast<std::int16_t>(sum);
}

void zxDate::add_months(std::int32_t n) {
  DateFields date;
  if (!get_full(date.year, date.month, date.day)) return;
  std::int64_t month = std::int64_t{n} + date.month - 1;  // from January
  std::int64_t years = month / 12;
  month %= 12;
  if (month < 0) {
    month += 12;
    --years;
  }
  set(date.year + static_cast<std::int32_t>(years),
      static_cast<std::int32_t>(month) + 1, date.day);
}

void zxDate::set_day(std::int32_t day) {
  DateFields date;
  if (!get_full(date.year, date.month, date.day)) return;
  const std::int32_t length =
      zxdate_detail::days_of_month(date.year, date.month);
  if (!ZX_ASSERT(is_between(1, day, length))) return;
  set(date.year, date.month, day);
}

void zxDate::set_month(std::int32_t month) {
  DateFields date;
  if (!get_full(date.year, date.month, date.day)) return;
  if (!ZX_ASSERT(is_between(1, month, 12))) return;
  const std::int32_t length = zxdate_detail::days_of_month(date.year, month);
  set(date.year, month, std::min(date.day, length));
}

// A year of two digits is a leap year when the year that it stands for is.
void zxDate::set_year(std::int32_t year) {
  DateFields date;
  if (!get_full(date.year, date.month, date.day)) return;
  const std::int32_t length = zxdate_detail::days_of_month(year, date.month);
  set(year, date.month, std::min(date.day, length));
}

std::int32_t zxDate::count_weekend_days(zxDate to) const {
  return zxdate_detail::weekend_days(count, to.count);
}

// ---- text

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

zxStr zxDate::to_text_full() const {
  DateFields date;
  if (!get_full(date.year, date.month, date.day)) return {};
  char text[10];
  put_two_digits(text, date.day);
  text[2] = '-';
  put_two_digits(text + 3, date.month);
  text[5] = '-';
  put_two_digits(text + 6, date.year / 100);
  put_two_digits(text + 8, date.year % 100);
  return {text, sizeof text};
}
