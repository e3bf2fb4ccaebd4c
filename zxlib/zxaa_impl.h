// zxaa_impl.h - the parts of a hash table beside its entries.
//
// The entries lie one behind the other, in the order of their arrival.  An
// index of cells, by a hash of 32 bits, finds the entry of a key.
//
// Iteration goes by slot.  The slot of an entry follows from the checksum of
// its key, of which strings have only 16 bits, and from all that happened to
// the table before; walking from slot to slot to find a key would take ever
// longer in large tables, and so would moving entries at each growth.  So the
// order of slots is worked out when somebody first asks for it, by an
// iteration or a removal: until then the table keeps a log of its growths,
// which with the order of arrival tells all.  From then on it is kept.
//
// All of it lies in the table's one block, laid out for `room` slots:
//
//   | Header | entries | cells | hashes | slots | map, summary | log |
//            ^ zxAA::table
#ifndef ZXAA_IMPL_H
#define ZXAA_IMPL_H

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace zxaa_impl {

// ------------------------------------------------------------- the hash --

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

// True if the bytes are the same.  Keys are short, so it does without a call.
inline bool same_bytes(const char* a, const char* b, std::size_t size) {
  if (size < 8) {
    for (std::size_t i = 0; i < size; ++i)
      if (a[i] != b[i]) return false;
    return true;
  }
  for (std::size_t at = 0; at + 8 < size; at += 8)
    if (load8(a + at) != load8(b + at)) return false;
  return load8(a + size - 8) == load8(b + size - 8);
}

// ------------------------------------------------------------- the index --

// A place of the index.
struct Cell {
  std::uint32_t hash;
  std::int32_t entry_above;  // the entry plus one; 0 marks an empty cell
};

// The cells: open addressing, filled to little more than a half at most.
class Index {
 public:
  Index() = default;
  // On zeroed memory of cell_count(room) cells.
  Index(Cell* memory, std::int32_t room)
      : cells(memory), mask(static_cast<std::uint32_t>(cell_count(room) - 1)) {}

  static std::uint64_t cell_count(std::int32_t room) {
    const auto count = static_cast<std::uint64_t>(room);
    return std::bit_ceil(count + count / 2);
  }

  // The cell of the hash whose entry `matches`, else the empty one at which
  // the walk ended; null if there is no end.
  template <class Matches>
  Cell* find(std::uint32_t hash, Matches matches) const {
    std::uint32_t i = hash & mask;
    for (std::uint32_t steps = 0; steps <= mask; ++steps, i = (i + 1) & mask) {
      Cell& cell = cells[i];
      if (cell.entry_above == 0) return &cell;
      if (cell.hash == hash && matches(cell.entry_above - 1)) return &cell;
    }
    return nullptr;
  }

  // Stores an entry that is not there yet.
  void add(std::uint32_t hash, std::int32_t entry);
  // Notes that the entry has another number.
  void renumber(std::uint32_t hash, std::int32_t from, std::int32_t to);
  // Empties a cell and closes the gap that it leaves in its run.
  void remove(Cell* cell);
  // Takes over all that another index holds; this one is empty.
  void take_over(const Index& other);

 private:
  Cell* cells = nullptr;
  std::uint32_t mask = 0;
};

// ------------------------------------------------------ the order of slots --

// A map of slots with a summary, so that a run of any length is passed in a
// few steps.
class SlotMap {
 public:
  SlotMap() = default;
  // On zeroed memory of word_count(slots) words.
  SlotMap(std::uint64_t* memory, std::int32_t slots);

  static std::size_t word_count(std::int32_t slots);

  void take(std::int32_t slot);
  void free(std::int32_t slot);

  // The first free slot from `home` on, going on at slot 0 behind the last;
  // -1 if there is none.
  std::int32_t first_free(std::int32_t home) const;

 private:
  std::int32_t first_free_from(std::size_t word) const;

  std::uint64_t* taken = nullptr;  // a bit for each slot, beyond the last set
  std::size_t words = 0;
  std::uint64_t* full = nullptr;  // a bit for each word: all of it is taken
};

// What masks a hash to its home slot; 0 if that takes a division.
inline std::uint32_t mask_of(std::uint32_t slots) {
  return std::has_single_bit(slots) ? slots - 1 : 0;
}

// Which entry lies in which slot.
class SlotOrder {
 public:
  // The memory is that of a block with `room` slots.
  struct Memory {
    std::uint32_t* hashes;        // `room` of them
    std::int32_t* entries_above;  // `room` of them
    std::uint64_t* map;           // SlotMap::word_count(room) words
  };

  SlotOrder() = default;
  explicit SlotOrder(const Memory& parts) : memory(parts) {}

  // Begins with empty slots.
  void start(std::int32_t slots);

  // Puts the entry into the first free slot from its home on, which its hash
  // tells; false if there is none.
  bool add(std::int32_t entry, std::uint32_t hash);

  // Changes the number of slots: the entries go to the first free slots from
  // their homes on, in the order of the slots in which they lay.
  void grow(std::int32_t slots);

  // Empties the entry's slot.  Later entries of the run move into the hole,
  // as far as their walks from home would otherwise end at it.
  void remove(std::int32_t entry);

  // Gives an entry another number, which is free.
  void renumber(std::int32_t from, std::int32_t to);

  // Takes over what another order with no more room holds.
  void take_over(const SlotOrder& other);

  // The entry in a slot plus one; 0 for none.
  const std::int32_t* slots() const { return memory.entries_above; }

 private:
  std::int32_t home_of(std::uint32_t hash) const {
    const auto home = mask != 0 ? hash & mask : hash % size;
    return static_cast<std::int32_t>(home);
  }
  std::int32_t slot_of(std::int32_t entry) const;
  std::int32_t next(std::int32_t slot) const {
    return static_cast<std::uint32_t>(slot) + 1 == size ? 0 : slot + 1;
  }

  Memory memory = {};
  std::uint32_t size = 0;
  std::uint32_t mask = 0;
  SlotMap map;
};

// ------------------------------------------------------------- the block --

// A growth: what the number of entries was when the table got so many slots.
struct Growth {
  std::int32_t entries;
  std::int32_t slots;
};

// What stands ahead of the entries.
struct alignas(8) Header {
  Index index;
  SlotOrder order;
  std::int32_t room;     // slots for which the block is laid out
  bool ordered;          // the order of slots is kept; else there is a log
  std::int32_t growths;  // entries of the log
  Growth* log;

  // Takes over all that the header of a block with less room tells.
  void take_over(const Header& other);
};

// The parts of a block for `room` slots with entries of the given size.
class Layout {
 public:
  Layout(std::int32_t room, std::size_t entry_size);

  // The bytes of the block; it may be more than there can be.
  std::uint64_t bytes() const { return end; }

  // Makes the header at the start of the memory, with an empty index.
  Header* make_header(void* memory) const;

  static std::int32_t log_room(std::int32_t room) { return room / 512 + 32; }

 private:
  std::int32_t room;
  std::uint64_t cells, hashes, slots, map, log, end;
};

}  // namespace zxaa_impl

#endif  // ZXAA_IMPL_H
