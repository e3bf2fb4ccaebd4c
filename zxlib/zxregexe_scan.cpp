// Scanning for bytes of a set, sixteen at a time where the set is made up of
// a few ranges.

#include <emmintrin.h>

#include <bit>
#include <cstddef>

#include "zxregexe_impl.h"

namespace zxregexe {

namespace {

constexpr std::ptrdiff_t k_block = 16;

// The ranges of a set, spread over registers.
template <int count>
class RangeTest {
 public:
  explicit RangeTest(const zxByteRanges& ranges)
      : flip(ranges.complement != 0 ? k_all : 0U) {
    for (int i = 0; i < count; ++i) {
      low[i] = _mm_set1_epi8(static_cast<char>(ranges.low[i]));
      span[i] = _mm_set1_epi8(static_cast<char>(ranges.span[i]));
    }
  }

  // A bit for each of 16 bytes: whether it is in the set.
  unsigned operator()(const char* at) const {
    const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(at));
    __m128i hits = within(bytes, 0);
    for (int i = 1; i < count; ++i) hits = _mm_or_si128(hits, within(bytes, i));
    return static_cast<unsigned>(_mm_movemask_epi8(hits)) ^ flip;
  }

 private:
  static constexpr unsigned k_all = 0xFFFF;

  // byte - low <= span, all unsigned
  __m128i within(__m128i bytes, int i) const {
    const __m128i distance = _mm_sub_epi8(bytes, low[i]);
    return _mm_cmpeq_epi8(_mm_min_epu8(distance, span[i]), distance);
  }

  __m128i low[count];
  __m128i span[count];
  unsigned flip;
};

// One set of a plan.
class ByteScan {
 public:
  ByteScan(const zxRegexPlan& plan, unsigned set)
      : table(plan.tables() + set / 8 * 256),
        mask(1U << (set % 8)),
        its_ranges(plan.sets()[set]) {}

  bool has(char byte) const {
    return (table[static_cast<unsigned char>(byte)] & mask) != 0;
  }
  const zxByteRanges& ranges() const { return its_ranges; }

 private:
  const std::uint8_t* table;
  unsigned mask;
  const zxByteRanges& its_ranges;
};

// The first of the blocks of 16 from `at` to `end` in which a byte has the
// membership that is `wanted`: that byte; else where the last block ends.
template <bool wanted, int count>
const char* find_in_blocks(const zxByteRanges& ranges, const char* at,
                           const char* end) {
  const RangeTest<count> test(ranges);
  for (; end - at >= k_block; at += k_block) {
    const unsigned hits = wanted ? test(at) : test(at) ^ 0xFFFF;
    if (hits != 0) return at + std::countr_zero(hits);
  }
  return at;
}

template <bool wanted>
const char* find_in_blocks(const zxByteRanges& ranges, const char* at,
                           const char* end) {
  switch (ranges.count) {
    case 1:
      return find_in_blocks<wanted, 1>(ranges, at, end);
    case 2:
      return find_in_blocks<wanted, 2>(ranges, at, end);
    case 3:
      return find_in_blocks<wanted, 3>(ranges, at, end);
    default:
      return at;
  }
}

// The first byte whose membership is `wanted`.
template <bool wanted>
const char* find(const ByteScan& set, const char* at, const char* end) {
  at = find_in_blocks<wanted>(set.ranges(), at, end);
  while (at < end && set.has(*at) != wanted) ++at;
  return at;
}

// The same from the end: the byte, or where the first block begins.
template <int count>
const char* find_last_in_blocks(const zxByteRanges& ranges, const char* at,
                                const char* end) {
  const RangeTest<count> test(ranges);
  for (; end - at >= k_block; end -= k_block) {
    const unsigned hits = test(end - k_block);
    if (hits != 0) return end - k_block + std::bit_width(hits);
  }
  return end;
}

}  // namespace

const char* find_in(const zxRegexPlan& plan, unsigned set, const char* at,
                    const char* end) {
  return find<true>(ByteScan(plan, set), at, end);
}

const char* find_not_in(const zxRegexPlan& plan, unsigned set, const char* at,
                        const char* end) {
  return find<false>(ByteScan(plan, set), at, end);
}

const char* find_last_in(const zxRegexPlan& plan, unsigned number,
                         const char* at, const char* end) {
  const ByteScan set(plan, number);
  const zxByteRanges& ranges = set.ranges();
  if (ranges.count == 1)
    end = find_last_in_blocks<1>(ranges, at, end);
  else if (ranges.count == 2)
    end = find_last_in_blocks<2>(ranges, at, end);
  else if (ranges.count == 3)
    end = find_last_in_blocks<3>(ranges, at, end);
  while (end > at)
    if (set.has(*--end)) return end;
  return nullptr;
}

}  // namespace zxregexe
