// zxtime.cpp - times of the local clock, text forms of moments.
// Tests: tests/zxlib/zxtime_test.cpp.
#include "zxtime.h"

#include <cstddef>
#include <iterator>

#include "zxplat.h"

using zxdate_detail::DateFields;
using zxdate_detail::is_between;
using zxdate_detail::k_first_year;

namespace {

constexpr std::int32_t k_seconds_of_day = 86400;
constexpr std::int32_t k_last_year = 2038;

constexpr std::size_t k_form_room = 40;
constexpr const char* k_forms[] = {
    "%d-%m-%y %H:%M:%S", "%d-%m-%y",       "%H:%M:%S",
    "%y/%m/%d %H:%M:%S", "%d-%m-%y %H:%M", "%b-%d %H:%M",
};

// Of the forms' letters "%b" alone goes by the locale.  Nothing here changes
// that of the C library, whose first one is plain English.
zxStr text_of_form(const std::tm& fields, std::int32_t index) {
  if (!ZX_ASSERT(is_between(0, index, std::ssize(k_forms) - 1))) return {};
  char text[k_form_room];
  const std::size_t length =
      std::strftime(text, sizeof text, k_forms[index], &fields);
  return {text, zx_count(length)};
}

// A form in letters that all C libraries take for the same; false if there
// is a letter of another kind in it.
bool to_common_letters(std::string_view form, zxStr& common) {
  constexpr std::string_view k_common = "aAbBdHIjmMpSUwWxXyYZ%";
  for (; !form.empty(); form.remove_prefix(1)) {
    common.append(form.front());
    if (form.front() != '%') continue;
    form.remove_prefix(1);
    if (form.empty()) return false;
    if (form.front() == 'c')
      common.append("m/%d/%y %H:%M:%S");
    else if (k_common.find(form.front()) != k_common.npos)
      common.append(form.front());
    else
      return false;
  }
  return true;
}

constexpr bool fits_32_bits(std::int64_t moment) {
  return moment >= INT32_MIN && moment <= INT32_MAX;
}

// Appends a separator and a number of two digits.
void append_part(zxStr& text, char separator, std::int32_t number) {
  text.append(separator)
      .append(static_cast<char>('0' + number / 10))
      .append(static_cast<char>('0' + number % 10));
}

// Reads ":" and a number.
bool read_behind_colon(const char*& at, std::int32_t& number) {
  return *at == ':' && zxdate_detail::read_number(++at, number);
}

}  // namespace

// ---- setting

void zxTime::set_raw(std::int32_t seconds) {
  if (ZX_ASSERT(seconds == k_null || seconds >= k_first)) count = seconds;
}

bool zxTime::set_time_t(std::int64_t moment) {
  const std::int64_t seconds = moment - zxplat::standard_zone_offset();
  const bool is_time =
      fits_32_bits(moment) && seconds >= k_first && seconds <= INT32_MAX;
  count = is_time ? static_cast<std::int32_t>(seconds) : k_null;
  return is_time;
}

// By arithmetic: the C library would take the standard time of that year,
// which is not today's in a zone that has moved since.
bool zxTime::try_set(std::int32_t year, std::int32_t month, std::int32_t day,
                     std::int32_t hour, std::int32_t minute,
                     std::int32_t second) {
  year = zxdate_detail::parsed_year(year);
  if (!is_between(k_first_year, year, k_last_year) ||
      !zxdate_detail::is_day({year, month, day}) || !is_between(0, hour, 23) ||
      !is_between(0, second, 59))
    return false;
  zxDate date;
  date.set(year, month, day);
  const std::int64_t seconds = std::int64_t{date.days()} * k_seconds_of_day +
                               hour * 3600 + std::int64_t{minute} * 60 + second;
  return set_time_t(seconds + zxplat::standard_zone_offset());
}

void zxTime::set(std::int32_t year, std::int32_t month, std::int32_t day,
                 std::int32_t hour, std::int32_t minute, std::int32_t second) {
  if (!try_set(year, month, day, hour, minute, second)) bail_detail(1803, 1);
}

bool zxTime::parse(const char* text) {
  if (text == nullptr || *text == '\0') {
    count = k_null;
    return true;
  }
  DateFields date;
  const char* at = zxdate_detail::read_date(text, date);
  if (at == nullptr) return false;
  std::int32_t hour = 0;
  std::int32_t minute = 0;
  std::int32_t second = 0;
  if (*at != '\0') {
    if (!zx_is_space(*at) || !zxdate_detail::read_number(++at, hour) ||
        !read_behind_colon(at, minute) || !read_behind_colon(at, second))
      return false;
  }
  return try_set(date.year, date.month, date.day, hour, minute, second);
}

// ---- fields

// The null time has none; a stored number that is no time fails.
bool zxTime::has_fields() const { return !is_null() && ZX_ASSERT(count > 0); }

std::int32_t zxTime::time_of_day() const {
  return has_fields() ? count % k_seconds_of_day : 0;
}

// Of a time that has fields.
zxDate zxTime::date() const {
  return zxDate::from_stored(
      static_cast<std::int16_t>(count / k_seconds_of_day));
}

std::int64_t zxTime::to_time_t() const {
  if (is_null()) return INT32_MIN;
  const std::int64_t moment =
      std::int64_t{count} + zxplat::standard_zone_offset();
  return fits_32_bits(moment) ? moment : -1;
}

void zxTime::get(std::int32_t& year, std::int32_t& month, std::int32_t& day,
                 std::int32_t& hour, std::int32_t& minute,
                 std::int32_t& second) const {
  get_date(year, month, day);
  const std::int32_t seconds = time_of_day();
  hour = seconds / 3600;
  minute = seconds / 60 % 60;
  second = seconds % 60;
}

void zxTime::get_date(std::int32_t& year, std::int32_t& month,
                      std::int32_t& day) const {
  if (has_fields() && date().get_full(year, month, day)) return;
  year = 0;
  month = 0;
  day = 0;
}

std::int32_t zxTime::year() const {
  return has_fields() ? date().full_year() : 0;
}

std::int32_t zxTime::month() const { return has_fields() ? date().month() : 0; }

std::int32_t zxTime::day() const { return has_fields() ? date().day() : 0; }

std::int32_t zxTime::hour() const { return time_of_day() / 3600; }

std::int32_t zxTime::minute() const { return time_of_day() / 60 % 60; }

std::int32_t zxTime::second() const { return time_of_day() % 60; }

std::int32_t zxTime::day_of_week() const {
  return has_fields() ? date().day_of_week() : 0;
}

std::int32_t zxTime::days_in_month() const {
  return has_fields() ? date().days_in_month() : 0;
}

// ---- reckoning

zxTime zxTime::end_of_month() const {
  if (!has_fields()) return *this;
  const std::int32_t days_left = date().days_in_month() - date().day();
  const std::int64_t seconds =
      count + std::int64_t{days_left} * k_seconds_of_day;
  if (!ZX_ASSERT(seconds <= INT32_MAX)) return *this;
  return from_stored(static_cast<std::int32_t>(seconds));
}

void zxTime::add_days(std::int32_t n) {
  const std::int64_t seconds = count + std::int64_t{n} * k_seconds_of_day;
  if (!ZX_ASSERT(!is_null() && seconds >= k_first && seconds <= INT32_MAX))
    return;
  count = static_cast<std::int32_t>(seconds);
}

std::int32_t zxTime::count_weekend_days(zxTime to) const {
  if (!has_fields() || to.count < count) return 0;
  const std::int32_t first = date().days();
  const std::int32_t steps = (to.count - count) / k_seconds_of_day;
  return zxdate_detail::weekend_days(first, first + steps);
}

// ---- text

zxStr zxTime::format(std::int32_t index) const {
  if (!has_fields()) return {};
  std::tm fields = {};
  get(fields.tm_year, fields.tm_mon, fields.tm_mday, fields.tm_hour,
      fields.tm_min, fields.tm_sec);
  fields.tm_year -= 1900;
  fields.tm_mon -= 1;
  return text_of_form(fields, index);
}

zxStr zxTime::to_text() const {
  if (!has_fields()) return {};
  const std::int32_t seconds = time_of_day();
  zxStr text = date().to_text_full();
  append_part(text, ' ', seconds / 3600);
  append_part(text, ':', seconds / 60 % 60);
  append_part(text, ':', seconds % 60);
  return text;
}

// ---- moments

std::int64_t start_of_day(zxDate date) {
  std::int32_t year, month, day;
  if (!date.get_full(year, month, day)) return -1;
  const std::int64_t moment = std::int64_t{date.days()} * k_seconds_of_day +
                              zxplat::standard_zone_offset();
  return fits_32_bits(moment) ? moment : -1;
}

std::tm local_fields(std::int64_t moment) {
  std::tm fields = {};
  if (moment >= 1 && zxplat::local_time(moment, fields)) return fields;
  fields = {};
  fields.tm_mday = 1;
  return fields;
}

zxStr format_moment(std::int64_t moment, const char* form) {
  zxStr common;
  if (!to_common_letters(form, common)) return {};
  constexpr std::size_t k_room = 80;
  char text[k_room];
  const std::tm fields = local_fields(moment);
  return {text,
          zx_count(std::strftime(text, sizeof text, common.c_str(), &fields))};
}

zxStr format_time_t(std::optional<std::int64_t> moment, std::int32_t index) {
  return text_of_form(local_fields(moment ? *moment : zxplat::process.clock()),
                      index);
}
