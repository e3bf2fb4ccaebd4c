// zxplat_win32_time.cpp - the local clock, for Windows.
// Tested by tests/zxlib/zxplat_time_test.cpp.

#include <time.h>

#include "zxplat_impl.h"
#include "zxplat_win32_impl.h"

namespace zxplat {
namespace {

using common::has_fields;
using win32::Attempt;

}  // namespace

bool local_time(std::int64_t moment, std::tm& fields) {
  if (!has_fields(moment)) return win32::fail_with(k_err_bad_parameter);
  const Attempt attempt;
  const __time64_t time = moment;
  ::_tzset();
  const std::tm* const found = ::_localtime64(&time);
  attempt.restore();
  if (found == nullptr) return win32::fail_with(k_err_bad_parameter);
  fields = *found;
  return true;
}

std::int32_t standard_zone_offset() {
  const Attempt attempt;
  ::_tzset();
  attempt.restore();
  return static_cast<std::int32_t>(_timezone);
}

}  // namespace zxplat
