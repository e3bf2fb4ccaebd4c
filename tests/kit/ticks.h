// ticks.h - the test kit: clocks that stand still.
#ifndef KIT_TICKS_H
#define KIT_TICKS_H

#include <cstdint>

#include "zxplat.h"

namespace kit {

// While one lives, zxplat::process.ticks() is always `ticks`.
class Ticks {
 public:
  explicit Ticks(std::uint32_t ticks) {
    now = ticks;
    zxplat::process.ticks = [] { return now; };
  }
  Ticks(const Ticks&) = delete;
  Ticks& operator=(const Ticks&) = delete;
  ~Ticks() { zxplat::process.ticks = zxplat::system_process.ticks; }

 private:
  static inline std::uint32_t now;
};

// While one lives, zxplat::process.clock() is always `moment`.
class Clock {
 public:
  explicit Clock(std::int64_t moment) {
    now = moment;
    zxplat::process.clock = [] { return now; };
  }
  Clock(const Clock&) = delete;
  Clock& operator=(const Clock&) = delete;
  ~Clock() { zxplat::process.clock = zxplat::system_process.clock; }

 private:
  static inline std::int64_t now;
};

}  // namespace kit

#endif  // KIT_TICKS_H
