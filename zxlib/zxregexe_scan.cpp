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

// Calls `find` with the test of the set; `otherwise`, if it has no ranges or
// too many.
template <class Find>
const char* with_test(const zxByteRanges& ranges, const char* otherwise,
                      Find find) {
  switch (ranges.count) {
    case 1:
      return find(RangeTest<1>(ranges));
    case 2:
      return find(RangeTest<2>(ranges));
    case 3:
      return find(RangeTest<3>(ranges));
    default:
      return otherwise;
  }
}

// The first byte whose membership is `wanted`: in blocks of 16 as far as they
// go, then one by one.
template <bool wanted>
const char* find(const ByteScan& set, const char* at, const char* end) {
  at = with_test(set.ranges(), at, [at, end](const auto& test) {
    const char* block = at;
    for (; end - block >= k_block; block += k_block) {
      const unsigned hits = wanted ? test(block) : test(block) ^ 0xFFFF;
      if (hits != 0) return block + std::countr_zero(hits);
    }
    return block;
  });
  while (at < end && set.has(*at) != wanted) ++at;
  return at;
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
  end = with_test(set.ranges(), end, [at, end](const auto& test) {
    const char* block = end;
    for (; block - at >= k_block; block -= k_block) {
      const unsigned hits = test(block - k_block);
      if (hits != 0) return block - k_block + std::bit_width(hits);
    }
    return block;
  });
  while (end > at)
    if (set.has(*--end)) return end;
  return nullptr;
}

}  // namespace zxregexe
