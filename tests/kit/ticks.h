// ticks.h - the test kit: a clock of milliseconds that stands still.
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

}  // namespace kit

#endif  // KIT_TICKS_H
