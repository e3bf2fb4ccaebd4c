// Scanning for bytes of a set, sixteen at a time where the set is made up of
// a few ranges.

#include <emmintrin.h>

#include <bit>
#include <cstddef>

#include "zxregexe_impl.h"

namespace zxregexe {

namespace {

constexpr std::ptrdiff_t k_block = 16;

// The ranges of a set, spread over registers.  A range that is not there
// repeats the first one.
class RangeTest {
 public:
  explicit RangeTest(const zxByteRanges& ranges)
      : flip(ranges.complement != 0 ? k_all : 0U) {
    for (int i = 0; i < zxByteRanges::k_most; ++i) {
      const int from = i < ranges.count ? i : 0;
      low[i] = _mm_set1_epi8(static_cast<char>(ranges.low[from]));
      span[i] = _mm_set1_epi8(static_cast<char>(ranges.span[from]));
    }
  }

  // A bit for each of 16 bytes: whether it is in the set.
  unsigned operator()(const char* at) const {
    const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(at));
    __m128i hits = within(bytes, 0);
    hits = _mm_or_si128(hits, within(bytes, 1));
    hits = _mm_or_si128(hits, within(bytes, 2));
    return static_cast<unsigned>(_mm_movemask_epi8(hits)) ^ flip;
  }

 private:
  static constexpr unsigned k_all = 0xFFFF;

  // byte - low <= span, all unsigned
  __m128i within(__m128i bytes, int i) const {
    const __m128i distance = _mm_sub_epi8(bytes, low[i]);
    return _mm_cmpeq_epi8(_mm_min_epu8(distance, span[i]), distance);
  }

  __m128i low[zxByteRanges::k_most];
  __m128i span[zxByteRanges::k_most];
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
  bool has_ranges() const {
    return its_ranges.count != k_many_ranges && its_ranges.count != 0;
  }

 private:
  const std::uint8_t* table;
  unsigned mask;
  const zxByteRanges& its_ranges;
};

// The first byte whose membership is `wanted`.
template <bool wanted>
const char* find(const ByteScan& set, const char* at, const char* end) {
  const char* const first_end = end - at > k_block ? at + k_block : end;
  for (; at < first_end; ++at)
    if (set.has(*at) == wanted) return at;
  if (set.has_ranges() && end - at >= k_block) {
    const RangeTest test(set.ranges());
    for (; end - at >= k_block; at += k_block) {
      const unsigned hits = wanted ? test(at) : test(at) ^ 0xFFFF;
      if (hits != 0) return at + std::countr_zero(hits);
    }
  }
  for (; at < end; ++at)
    if (set.has(*at) == wanted) return at;
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
  const char* const first_begin = end - at > k_block ? end - k_block : at;
  while (end > first_begin)
    if (set.has(*--end)) return end;
  if (set.has_ranges() && end - at >= k_block) {
    const RangeTest test(set.ranges());
    for (; end - at >= k_block; end -= k_block) {
      const unsigned hits = test(end - k_block);
      if (hits != 0) return end - k_block + std::bit_width(hits) - 1;
    }
  }
  while (end > at)
    if (set.has(*--end)) return end;
  return nullptr;
}

}  // namespace zxregexe
