// zxaa.cpp - the parts of a hash table beside its entries.
// Tests: tests/zxlib/zxaa_test.cpp.
#include "zxaa.h"

namespace zxaa_impl {

// ------------------------------------------------------------- the index --

void Index::add(std::uint32_t hash, std::int32_t entry) {
  Cell* cell = find(hash, [](std::int32_t) { return false; });
  if (cell != nullptr) *cell = {hash, entry + 1};
}

void Index::renumber(std::uint32_t hash, std::int32_t from, std::int32_t to) {
  Cell* cell = find(hash, [from](std::int32_t entry) { return entry == from; });
  if (cell != nullptr && cell->entry_above != 0) cell->entry_above = to + 1;
}

void Index::remove(Cell* cell) {
  auto hole = static_cast<std::uint32_t>(cell - cells);
  for (std::uint32_t i = (hole + 1) & mask; cells[i].entry_above != 0;
       i = (i + 1) & mask) {
    const std::uint32_t home = cells[i].hash & mask;
    if (((i - home) & mask) < ((i - hole) & mask)) continue;
    cells[hole] = cells[i];
    hole = i;
  }
  cells[hole] = {};
}

void Index::take_over(const Index& other) {
  for (std::uint32_t i = 0; i <= other.mask; ++i)
    if (other.cells[i].entry_above != 0)
      add(other.cells[i].hash, other.cells[i].entry_above - 1);
}

// ------------------------------------------------------ the map of slots --

namespace {

constexpr std::uint64_t k_all = ~std::uint64_t{0};

std::size_t words_for(std::int32_t slots) { return (zx_size(slots) + 63) / 64; }
std::size_t word_of(std::int32_t slot) { return zx_size(slot) / 64; }
std::uint64_t bit_of(std::size_t number) {
  return std::uint64_t{1} << number % 64;
}

}  // namespace

std::size_t SlotMap::word_count(std::int32_t slots) {
  const std::size_t words = words_for(slots);
  return words + (words + 63) / 64;
}

SlotMap::SlotMap(std::uint64_t* memory, std::int32_t slots)
    : taken(memory), words(words_for(slots)), full(memory + words) {
  if (slots % 64 != 0) taken[words - 1] = k_all << slots % 64;
  if (words % 64 != 0) full[words / 64] = k_all << words % 64;
}

void SlotMap::take(std::int32_t slot) {
  const std::size_t word = word_of(slot);
  taken[word] |= bit_of(zx_size(slot));
  if (taken[word] == k_all) full[word / 64] |= bit_of(word);
}

void SlotMap::free(std::int32_t slot) {
  const std::size_t word = word_of(slot);
  taken[word] &= ~bit_of(zx_size(slot));
  full[word / 64] &= ~bit_of(word);
}

std::int32_t SlotMap::first_free(std::int32_t home) const {
  const std::size_t word = word_of(home);
  const std::uint64_t here = ~taken[word] & k_all << home % 64;
  if (here != 0)
    return static_cast<std::int32_t>(word * 64) + std::countr_zero(here);
  const std::int32_t behind = first_free_from(word + 1);
  return behind >= 0 ? behind : first_free_from(0);
}

// The first free slot of the first word from `word` on that is not full; -1
// if there is none.
std::int32_t SlotMap::first_free_from(std::size_t word) const {
  std::uint64_t mask = k_all << word % 64;
  for (std::size_t i = word / 64; i * 64 < words; ++i) {
    const std::uint64_t open = ~full[i] & mask;
    mask = k_all;
    if (open == 0) continue;
    const std::size_t found =
        i * 64 + static_cast<std::size_t>(std::countr_zero(open));
    return static_cast<std::int32_t>(found * 64) +
           std::countr_zero(~taken[found]);
  }
  return -1;
}

// ------------------------------------------------------ the order of slots --

void SlotOrder::start(std::int32_t slots) {
  size = static_cast<std::uint32_t>(slots);
  mask = mask_of(size);
  std::memset(memory.entries_above, 0, size * sizeof(std::int32_t));
  std::memset(memory.map, 0,
              SlotMap::word_count(slots) * sizeof(std::uint64_t));
  map = SlotMap(memory.map, slots);
}

bool SlotOrder::add(std::int32_t entry, std::uint32_t hash) {
  const std::int32_t slot = map.first_free(home_of(hash));
  if (slot < 0) return false;
  map.take(slot);
  memory.entries_above[slot] = entry + 1;
  memory.hashes[entry] = hash;
  return true;
}

void SlotOrder::grow(std::int32_t slots) {
  const std::size_t bytes = size * sizeof(std::int32_t);
  auto* old = static_cast<std::int32_t*>(zx_realloc(nullptr, bytes + 1));
  std::memcpy(old, memory.entries_above, bytes);
  const std::uint32_t old_size = size;
  start(slots);
  for (std::uint32_t i = 0; i < old_size; ++i)
    if (old[i] != 0) add(old[i] - 1, memory.hashes[old[i] - 1]);
  zx_realloc(old, 0);
}

// The slot of an entry; -1 in a broken order.
std::int32_t SlotOrder::slot_of(std::int32_t entry) const {
  std::int32_t slot = home_of(memory.hashes[entry]);
  for (std::uint32_t steps = 0; steps < size; ++steps, slot = next(slot))
    if (memory.entries_above[slot] == entry + 1) return slot;
  return -1;
}

void SlotOrder::remove(std::int32_t entry) {
  std::int32_t* const above = memory.entries_above;
  std::int32_t hole = slot_of(entry);
  if (hole < 0) return;
  above[hole] = 0;
  for (std::int32_t i = next(hole); above[i] != 0; i = next(i)) {
    const std::int32_t home = home_of(memory.hashes[above[i] - 1]);
    const bool passes_hole =
        i > hole ? home <= hole || home > i : home <= hole && home > i;
    if (!passes_hole) continue;
    above[hole] = above[i];
    above[i] = 0;
    hole = i;
  }
  map.free(hole);
}

void SlotOrder::renumber(std::int32_t from, std::int32_t to) {
  const std::int32_t slot = slot_of(from);
  if (slot >= 0) memory.entries_above[slot] = to + 1;
  memory.hashes[to] = memory.hashes[from];
}

void SlotOrder::take_over(const SlotOrder& other) {
  start(static_cast<std::int32_t>(other.size));
  std::memcpy(memory.hashes, other.memory.hashes,
              other.size * sizeof(std::uint32_t));
  for (std::uint32_t i = 0; i < size; ++i) {
    const std::int32_t above = other.memory.entries_above[i];
    memory.entries_above[i] = above;
    if (above != 0) map.take(static_cast<std::int32_t>(i));
  }
}

// ------------------------------------------------------------- the block --

void Header::take_over(const Header& other) {
  index.take_over(other.index);
  ordered = other.ordered;
  growths = other.growths;
  std::memcpy(log, other.log, zx_size(growths) * sizeof(Growth));
  if (ordered) order.take_over(other.order);
}

Layout::Layout(std::int32_t slots_of_room, std::size_t entry_size)
    : room(slots_of_room) {
  const auto padded = [](std::uint64_t bytes) {
    return (bytes + 7) & ~std::uint64_t{7};
  };
  const auto n = static_cast<std::uint64_t>(room);
  cells = sizeof(Header) + padded(n * entry_size);
  hashes = cells + Index::cell_count(room) * sizeof(Cell);
  slots = hashes + padded(n * sizeof(std::uint32_t));
  map = slots + padded(n * sizeof(std::int32_t));
  log = map + SlotMap::word_count(room) * sizeof(std::uint64_t);
  end = log + zx_size(log_room(room)) * sizeof(Growth);
}

Header* Layout::make_header(void* memory) const {
  const auto part = [memory](std::uint64_t offset) {
    return static_cast<void*>(static_cast<char*>(memory) +
                              static_cast<std::size_t>(offset));
  };
  std::memset(part(cells), 0, static_cast<std::size_t>(hashes - cells));
  const SlotOrder::Memory parts = {static_cast<std::uint32_t*>(part(hashes)),
                                   static_cast<std::int32_t*>(part(slots)),
                                   static_cast<std::uint64_t*>(part(map))};
  return ::new (memory) Header{Index(static_cast<Cell*>(part(cells)), room),
                               SlotOrder(parts),
                               room,
                               false,
                               0,
                               static_cast<Growth*>(part(log))};
}

}  // namespace zxaa_impl
