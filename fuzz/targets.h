// targets.h - the fuzz targets: functions that take any bytes and must come
// back.
//
// A target ends the process with a word about it (require) when something
// does not hold that must.  It keeps nothing from call to call that another
// input would notice.
#ifndef FUZZ_TARGETS_H
#define FUZZ_TARGETS_H

#include <cstdint>
#include <span>

namespace fuzz {

using Bytes = std::span<const std::uint8_t>;

// Each source, fuzz/TARGET.cpp, says how the bytes are read.
void formats(Bytes input);
void hebrew(Bytes input);
void patterns(Bytes input);
void unescape(Bytes input);

// Ends the process unless it holds.
void require(bool holds, const char* what);

}  // namespace fuzz

#endif  // FUZZ_TARGETS_H
