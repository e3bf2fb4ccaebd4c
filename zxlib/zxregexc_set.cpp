// Sets of bytes: those of nodes, as ranges, as tables.

#include "zxregexc_set_impl.h"

#include <bit>
#include <cstring>

namespace zxregexc {

using zxnode::Node;

namespace {

consteval ByteSet make_class_set(unsigned class_bits) {
  ByteSet set;
  for (unsigned c = 0; c < 256; ++c)
    if ((zxCharClass[c] & class_bits) != 0)
      set.bits[c / 64] |= 1ULL << (c % 64);
  return set;
}

// The sets of the class nodes, by opcode.
constexpr unsigned k_first_class = 10;
constexpr auto k_class_sets = [] {
  std::array<ByteSet, 10> sets;
  sets[0] = make_class_set(k_class_hebdos);
  sets[2] = make_class_set(k_class_hebrew);
  sets[4] = make_class_set(k_regex_word_class);
  sets[6] = make_class_set(k_class_space);
  sets[8] = make_class_set(k_class_digit);
  for (std::size_t i = 0; i < sets.size(); i += 2)
    sets[i + 1] = complement(sets[i]);
  return sets;
}();

// The bitmap of the node holds the bytes that don't match.
ByteSet anyof_set(Node node) {
  ByteSet set;
  static_assert(sizeof set.bits == k_bitmap_bytes);
  std::memcpy(set.bits.data(), zxnode::operand(node), k_bitmap_bytes);
  return complement(set);
}
static_assert(std::endian::native == std::endian::little);

// The first byte from `from` on that is (not) in the set; 256 if there is
// none.
template <bool wanted>
unsigned find(const ByteSet& set, unsigned from) {
  for (unsigned word = from / 64; word < set.bits.size(); ++word) {
    std::uint64_t bits = wanted ? set.bits[word] : ~set.bits[word];
    if (word == from / 64) bits &= ~0ULL << (from % 64);
    if (bits != 0)
      return word * 64 + static_cast<unsigned>(std::countr_zero(bits));
  }
  return 256;
}

// The set as ranges, if there are few of them.
bool find_ranges(const ByteSet& set, zxByteRanges& ranges) {
  ranges.count = 0;
  for (unsigned first = find<true>(set, 0); first < 256;) {
    const unsigned behind = find<false>(set, first);
    if (ranges.count == zxByteRanges::k_most) return false;
    ranges.low[ranges.count] = static_cast<std::uint8_t>(first);
    ranges.span[ranges.count++] = static_cast<std::uint8_t>(behind - first - 1);
    first = behind < 256 ? find<true>(set, behind) : 256;
  }
  return true;
}

// Adds bit `mask` to the bytes of a table that belong to the set, eight at a
// time: the eight bits are spread over eight bytes.
void fill_spread(std::uint8_t* table, const ByteSet& set, std::uint8_t mask) {
  constexpr std::uint64_t k_ones = 0x0101010101010101;
  constexpr std::uint64_t k_diagonal = 0x8040201008040201;
  constexpr std::uint64_t k_low_bits = 0x7F7F7F7F7F7F7F7F;
  for (unsigned i = 0; i < 32; ++i) {
    const std::uint64_t eight = set.bits[i / 8] >> (i % 8 * 8) & 0xFF;
    const std::uint64_t spread = (eight * k_ones) & k_diagonal;
    const std::uint64_t is_set =
        ((((spread & k_low_bits) + k_low_bits) | spread) >> 7) & k_ones;
    std::uint64_t cell;
    std::memcpy(&cell, table + 8 * i, sizeof cell);
    cell |= is_set * mask;
    std::memcpy(table + 8 * i, &cell, sizeof cell);
  }
}

void fill_ranges(std::uint8_t* table, const zxByteRanges& ranges,
                 std::uint8_t mask) {
  for (int i = 0; i < ranges.count; ++i)
    for (int n = 0; n <= ranges.span[i]; ++n) table[ranges.low[i] + n] |= mask;
}

}  // namespace

ByteSet first_set(Node node) {
  if (zxnode::info(node).class_bits != 0)
    return k_class_sets[*node - k_first_class];
  if (zxnode::is(node, zxNodeKind::any)) return k_all_bytes;
  if (zxnode::is(node, zxNodeKind::anyof)) return anyof_set(node);
  ByteSet set;
  set.add(zxnode::operand(node)[1]);
  return set;
}

// What stands in the chain of the only alternative is in every match.
ByteSet needed_set(const zxRegex& regex) {
  ByteSet smallest = k_all_bytes;
  const Node top = regex.program() + 1;
  if (zxnode::next_alternative(top) != nullptr) return smallest;
  for (Node node = zxnode::operand(top); node != nullptr;
       node = zxnode::next(node)) {
    const bool repeats = zxnode::is_repeat(node) && zxnode::minimum(node) > 0;
    const Node taker = repeats ? zxnode::repeated(node) : node;
    if (!zxnode::takes_bytes(taker)) continue;
    const ByteSet set = first_set(taker);
    if (set.size() < smallest.size()) smallest = set;
  }
  return smallest;
}

zxByteRanges ranges_of(const ByteSet& set) {
  zxByteRanges ranges{};
  if (find_ranges(set, ranges)) return ranges;
  ranges.complement = 1;
  if (!find_ranges(complement(set), ranges)) ranges.count = k_many_ranges;
  return ranges;
}

void fill_table(std::uint8_t* table, const ByteSet& set,
                const zxByteRanges& ranges, std::uint8_t mask) {
  if (ranges.complement == 0 && ranges.count != k_many_ranges)
    fill_ranges(table, ranges, mask);
  else
    fill_spread(table, set, mask);
}

}  // namespace zxregexc
