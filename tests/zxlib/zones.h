// zones.h - zones east and west, with and without daylight saving, in the form
// that every system takes.
#ifndef ZONES_H
#define ZONES_H

#include <cstdint>

struct Zone {
  const char* name;
  std::int32_t behind;  // seconds of its standard time behind UTC
  bool saves_daylight;
};

inline constexpr Zone k_zones[] = {
    {"UTC0", 0, false},           {"EST5EDT", 18'000, true},
    {"IST-2IDT", -7200, true},    {"NPT-5:45", -20'700, false},
    {"LNT-14", -50'400, false},   {"BKT12", 43'200, false},
    {"NST3:30NDT", 12'600, true},
};

#endif  // ZONES_H
