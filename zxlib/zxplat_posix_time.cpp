// zxplat_posix_time.cpp - the local clock, for POSIX systems.
// Tested by tests/zxlib/zxplat_time_test.cpp.

#include <time.h>

#include "zxplat_impl.h"
#include "zxplat_posix_impl.h"

namespace zxplat {

bool local_time(std::int64_t moment, std::tm& fields) {
  if (!common::has_fields(moment)) return posix::fail_with(k_err_bad_parameter);
  const time_t time = moment;
  ::tzset();
  std::tm found;
  if (::localtime_r(&time, &found) == nullptr)
    return posix::fail_with(k_err_bad_parameter);
  fields = found;
  return true;
}

// Breaking a moment down may change the variable to the offset of another
// rule; tzset() puts it right.
std::int32_t standard_zone_offset() {
  ::tzset();
  return static_cast<std::int32_t>(::timezone);
}

}  // namespace zxplat
