// zxaa_impl.h - what lies beside the entries of a hash table: how a look-up
// finds its entry, and how an insertion finds its slot.
//
// The slot of an entry is fixed by the checksum of its key, 16 bits for
// strings, and walking from slot to slot would take ever longer in large
// tables, where many keys share a home.  So
//   - an index of cells, by a hash of 32 bits, tells the slot of a key;
//   - a map of bits tells the first free slot behind a home.
// All of it lies in the table's one block:
//
//   | header | entries | cells | homes | map | summary |
//            ^ zxAA::table
#ifndef ZXAA_IMPL_H
#define ZXAA_IMPL_H

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace zxaa_impl {

// Loads of fixed size from anywhere.
inline std::uint64_t load8(const char* bytes) {
  std::uint64_t value;
  std::memcpy(&value, bytes, sizeof value);
  return value;
}
inline std::uint32_t load4(const char* bytes) {
  std::uint32_t value;
  std::memcpy(&value, bytes, sizeof value);
  return value;
}

inline constexpr std::uint64_t k_mix_1 = 0x9E3779B97F4A7C15;
inline constexpr std::uint64_t k_mix_2 = 0xC2B2AE3D27D4EB4F;

// The upper half of the last product has seen all bits.
inline std::uint32_t mixed(std::uint64_t a, std::uint64_t b) {
  std::uint64_t sum = (a ^ k_mix_2) * k_mix_1 ^ std::rotl(b * k_mix_2, 32);
  sum = (sum ^ sum >> 32) * k_mix_1;
  return static_cast<std::uint32_t>(sum >> 32);
}

// The hash of bytes by which cells are found.  It never leaves the process
// and may change at any time.
inline std::uint32_t hash_of_bytes(const char* bytes, std::size_t size) {
  if (size >= 8) {
    std::uint64_t sum = size;
    for (std::size_t at = 0; at + 8 < size; at += 8)
      sum = std::rotl((sum ^ load8(bytes + at)) * k_mix_1, 29);
    return mixed(load8(bytes + size - 8), sum);
  }
  if (size >= 4)
    return mixed(load4(bytes) + (std::uint64_t{size} << 32),
                 load4(bytes + size - 4));
  if (size == 0) return mixed(0, 0);
  const std::uint32_t all = static_cast<unsigned char>(bytes[0]) |
                            static_cast<unsigned char>(bytes[size / 2]) << 8 |
                            static_cast<unsigned char>(bytes[size - 1]) << 16;
  return mixed(all, size);
}

// A map of slots with a summary, so that a run of any length is passed in a
// few steps.
class SlotMap {
 public:
  SlotMap() = default;
  // On zeroed memory of word_count(slots) words.
  SlotMap(std::uint64_t* memory, std::int32_t slots)
      : taken(memory), words(words_for(slots)), full(memory + words) {
    if (slots % 64 != 0) taken[words - 1] = ~std::uint64_t{0} << slots % 64;
    const std::size_t rest = words % 64;
    if (rest != 0) full[words / 64] = ~std::uint64_t{0} << rest;
  }

  static std::size_t word_count(std::int32_t slots) {
    const std::size_t words = words_for(slots);
    return words + (words + 63) / 64;
  }

  void take(std::int32_t slot) {
    const std::size_t word = word_of(slot);
    taken[word] |= bit_of(slot);
    if (~taken[word] == 0) full[word / 64] |= std::uint64_t{1} << word % 64;
  }

  void free(std::int32_t slot) {
    const std::size_t word = word_of(slot);
    taken[word] &= ~bit_of(slot);
    full[word / 64] &= ~(std::uint64_t{1} << word % 64);
  }

  // The first free slot from `home` on, going on at slot 0 behind the last;
  // -1 if there is none.
  std::int32_t first_free(std::int32_t home) const {
    const std::size_t word = word_of(home);
    const std::uint64_t here = ~taken[word] & ~std::uint64_t{0} << home % 64;
    if (here != 0) return slot_of(word, here);
    const std::int32_t behind = first_free_from(word + 1);
    return behind >= 0 ? behind : first_free_from(0);
  }

 private:
  static std::size_t words_for(std::int32_t slots) {
    return (static_cast<std::size_t>(slots) + 63) / 64;
  }
  static std::size_t word_of(std::int32_t slot) {
    return static_cast<std::size_t>(slot) / 64;
  }
  static std::uint64_t bit_of(std::int32_t slot) {
    return std::uint64_t{1} << slot % 64;
  }
  static std::int32_t slot_of(std::size_t word, std::uint64_t free_bits) {
    return static_cast<std::int32_t>(word * 64) + std::countr_zero(free_bits);
  }

  // The first free slot of the first word from `word` on that is not full;
  // -1 if there is none.
  std::int32_t first_free_from(std::size_t word) const {
    std::uint64_t mask = ~std::uint64_t{0} << word % 64;
    for (std::size_t i = word / 64; i * 64 < words; ++i) {
      const std::uint64_t open = ~full[i] & mask;
      mask = ~std::uint64_t{0};
      if (open == 0) continue;
      const std::size_t found =
          i * 64 + static_cast<std::size_t>(std::countr_zero(open));
      return slot_of(found, ~taken[found]);
    }
    return -1;
  }

  std::uint64_t* taken = nullptr;  // a bit for each slot, beyond the last set
  std::size_t words = 0;
  std::uint64_t* full = nullptr;  // a bit for each word: all of it is taken
};

// A place of the index.
struct Cell {
  std::uint32_t hash;
  std::int32_t slot_above;  // the slot plus one; 0 marks an empty cell
};

// The cells: open addressing, filled to a half at most.
class Index {
 public:
  Index() = default;
  // On zeroed memory of cell_count(slots) cells.
  Index(Cell* memory, std::int32_t slots)
      : cells(memory),
        mask(static_cast<std::uint32_t>(cell_count(slots) - 1)) {}

  static std::uint64_t cell_count(std::int32_t slots) {
    const auto count = static_cast<std::uint64_t>(slots);
    return std::bit_ceil(count + count / 2);
  }

  // The cell of the hash whose slot `matches`, else the empty one at which
  // the walk ended; null if there is no end.
  template <class Matches>
  Cell* find(std::uint32_t hash, Matches matches) const {
    std::uint32_t i = hash & mask;
    for (std::uint32_t steps = 0; steps <= mask; ++steps, i = (i + 1) & mask) {
      Cell& cell = cells[i];
      if (cell.slot_above == 0) return &cell;
      if (cell.hash == hash && matches(cell.slot_above - 1)) return &cell;
    }
    return nullptr;
  }

  // Stores an entry that is not there yet.
  void add(std::uint32_t hash, std::int32_t slot) {
    Cell* cell = find(hash, [](std::int32_t) { return false; });
    if (cell != nullptr) *cell = {hash, slot + 1};
  }

  // Notes that the entry moved.
  void move(std::uint32_t hash, std::int32_t from, std::int32_t to) {
    Cell* cell = find(hash, [from](std::int32_t slot) { return slot == from; });
    if (cell != nullptr && cell->slot_above != 0) cell->slot_above = to + 1;
  }

  // Empties a cell and closes the gap that it leaves in its run.
  void remove(Cell* cell) {
    auto hole = static_cast<std::uint32_t>(cell - cells);
    for (std::uint32_t i = (hole + 1) & mask; cells[i].slot_above != 0;
         i = (i + 1) & mask) {
      const std::uint32_t home = cells[i].hash & mask;
      if (((i - home) & mask) < ((i - hole) & mask)) continue;
      cells[hole] = cells[i];
      hole = i;
    }
    cells[hole] = {};
  }

  // Takes over the entries of another index, each under the slot that
  // `new_slot` has for it.
  void take_over(const Index& other, const std::uint32_t* new_slot) {
    for (std::uint32_t i = 0; i <= other.mask; ++i) {
      const Cell& cell = other.cells[i];
      if (cell.slot_above == 0) continue;
      const auto slot =
          static_cast<std::int32_t>(new_slot[cell.slot_above - 1]);
      // In an index of the same size it has the same place.
      if (mask == other.mask)
        cells[i] = {cell.hash, slot + 1};
      else
        add(cell.hash, slot);
    }
  }

 private:
  Cell* cells = nullptr;
  std::uint32_t mask = 0;
};

// What stands ahead of the entries.
struct alignas(16) Header {
  Index index;
  SlotMap map;
  std::uint32_t* homes;  // the hash of each occupied slot's key
};

}  // namespace zxaa_impl

#endif  // ZXAA_IMPL_H
