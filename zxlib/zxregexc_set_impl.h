// zxregexc_set_impl.h - sets of bytes, of which the plan of a program is
// made.  Not installed.
#ifndef ZXREGEXC_SET_IMPL_H
#define ZXREGEXC_SET_IMPL_H

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>

#include "zxregexc_impl.h"

namespace zxregexc {

// A set of bytes.
struct ByteSet {
  std::array<std::uint64_t, 4> bits{};

  void add(unsigned byte) { bits[byte / 64] |= 1ULL << (byte % 64); }
  void add(const ByteSet& other) {
    for (std::size_t i = 0; i < bits.size(); ++i) bits[i] |= other.bits[i];
  }
  bool has(unsigned byte) const { return bits[byte / 64] >> (byte % 64) & 1; }
  int size() const {
    int count = 0;
    for (const std::uint64_t word : bits) count += std::popcount(word);
    return count;
  }
  bool meets(const ByteSet& other) const {
    for (std::size_t i = 0; i < bits.size(); ++i)
      if ((bits[i] & other.bits[i]) != 0) return true;
    return false;
  }
  bool operator==(const ByteSet& other) const {
    std::uint64_t different = 0;
    for (std::size_t i = 0; i < bits.size(); ++i)
      different |= bits[i] ^ other.bits[i];
    return different == 0;
  }
};

constexpr ByteSet complement(const ByteSet& set) {
  ByteSet other;
  for (std::size_t i = 0; i < other.bits.size(); ++i)
    other.bits[i] = ~set.bits[i];
  return other;
}

inline constexpr ByteSet k_all_bytes = complement(ByteSet{});

// The bytes that a node which takes at least one can begin with.
ByteSet first_set(zxnode::Node node);

// The smallest set that is known of which any match takes a byte; all bytes,
// if none is known.
ByteSet needed_set(const zxRegex& regex);

// The set as ranges, if there are few of them, or if those of the other bytes
// are few.
zxByteRanges ranges_of(const ByteSet& set);

// Adds bit `mask` to the bytes of a table of 256 that belong to the set, whose
// ranges are given.
void fill_table(std::uint8_t* table, const ByteSet& set,
                const zxByteRanges& ranges, std::uint8_t mask);

}  // namespace zxregexc

#endif  // ZXREGEXC_SET_IMPL_H
