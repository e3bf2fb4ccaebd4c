// zxaa.h - zxAA<K,V>, a hash table with open addressing, and zxSA<V>, its
// form with string keys, which looks up plain text without building a
// string.
//
// Entries lie inline in one block, without nodes or tombstones.  A new entry
// takes the first free slot from its home slot on, which the key's hash
// gives; iteration goes by slot, so its order follows the hash, and any growth
// or removal changes it.
//
// Capacities go 64, 128 ... 1024 and on in steps of 1024; the table grows
// when it is filled to four fifths.  ref() grows ahead of its insertion,
// also when the key is there already; set() grows behind it.
//
// References to values last until the next insertion or removal, so
// t.ref(a) = t.get(b) is the caller's fault; t.set(a, t.get(b)) is safe.
//
//   zxSA<zxStr> colours;
//   colours.ref("sky") = "blue";
//   for (auto [name, colour] : colours) oprint("#: #\n", name, colour);
//
// A key type says by zxKeyTraits<K> which key is null (its slot is empty; it
// may not be used) and how a key hashes.  For strings the null key is the
// null representation, never seen in a live string: "" is an ordinary key.
//
// After a failure that was dropped (see zxatsys.h) an operation leaves the
// table unchanged and returns a neutral value.
#ifndef ZXAA_H
#define ZXAA_H

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <iterator>
#include <new>

#include "zxaa_impl.h"
#include "zxatsys.h"
#include "zxmisc.h"
#include "zxqva.h"
#include "zxstr.h"

// hash() decides the home slot, and with it the order of the entries.  A key
// type with a cheap hash of good quality can offer it as find_hash(), which
// look-ups then use.
template <class K>
struct zxKeyTraits;

template <>
struct zxKeyTraits<zxStr> {
  static bool is_null(const zxStr& key) {
    return key.representation() == nullptr;
  }
  static std::uint32_t hash(const zxStr& key) {
    return crc16(key.c_str(), zx_size(key.length()));
  }
  static std::uint32_t find_hash(const zxStr& key) {
    return zxaa_impl::hash_of_bytes(key.c_str(), zx_size(key.length()));
  }
};

// Whole numbers are their own hash, cut to 32 bits; 0 is the null key.
template <std::integral K>
struct zxKeyTraits<K> {
  static bool is_null(K key) { return key == 0; }
  static std::uint32_t hash(K key) { return static_cast<std::uint32_t>(key); }
};

// Addresses hash by their bits, of which a wide one folds the upper half in.
template <class T>
struct zxKeyTraits<T*> {
  static bool is_null(const T* key) { return key == nullptr; }
  static std::uint32_t hash(const T* key) {
    const std::uint64_t bits = reinterpret_cast<std::uintptr_t>(key);
    return static_cast<std::uint32_t>(bits ^ bits >> 32);
  }
};

template <class K, class V>
class zxAA {
  static_assert(zx_relocatable<K> && zx_relocatable<V>,
                "entries are moved by their bytes");

 public:
  zxAA() = default;
  ~zxAA() { clear(); }
  zxAA(const zxAA&) = delete;
  zxAA& operator=(const zxAA&) = delete;

  // The number of entries, and of slots.
  std::int32_t length() const { return count; }
  std::int32_t slots() const { return capacity; }

  // The value of a key, or null.
  V* find(const K& key) {
    Entry* entry = find_entry(key);
    return entry ? &entry->value : nullptr;
  }
  const V* find(const K& key) const {
    return const_cast<zxAA*>(this)->find(key);
  }

  bool contains(const K& key) const { return find(key) != nullptr; }

  // True, and the value's address in `out`, if the key is there.
  bool lookup(const K& key, V*& out) {
    V* value = find(key);
    if (value != nullptr) out = value;
    return value != nullptr;
  }

  // The value, or the shared empty value.
  const V& get(const K& key) const {
    const V* value = find(key);
    return value ? *value : zx_empty_value<V>;
  }

  // The value; a key that is not there: message 2202.
  V& at(const K& key) {
    V* value = find(key);
    if (value != nullptr) return *value;
    bail_code(2202);
    return zx_scratch_value<V>();
  }

  // The value for writing; a new key gets a default value first.
  V& ref(const K& key) {
    if (!check_with(key)) return zx_scratch_value<V>();
    grow(0);
    const Place place = place_of(key);
    if (place.entry != nullptr) return place.entry->value;
    Entry* entry = take_slot(place, key);
    if (entry == nullptr) return zx_scratch_value<V>();
    return *::new (static_cast<void*>(&entry->value)) V();
  }

  // Inserts or overwrites.
  void set(const K& key, const V& value) {
    if (!check_with(key)) return;
    if (capacity == 0) grow(0);
    const Place place = place_of(key);
    if (place.entry != nullptr) {
      place.entry->value = value;
      return;
    }
    Entry* entry = take_slot(place, key);
    if (entry == nullptr) return;
    ::new (static_cast<void*>(&entry->value)) V(value);
    grow(0);
  }

  // Removes a key; one that is not there: message 2204.
  void erase(const K& key) {
    if (!check_with(key)) return;
    const Place place = place_of(key);
    if (place.entry == nullptr) return bail_code(2204);
    header().index.remove(place.cell);
    place.entry->value.~V();
    place.entry->key.~K();
    --count;
    close_gap(static_cast<std::int32_t>(place.entry - table));
  }

  // Empties the table and gives its block back.
  void clear() {
    for (std::int32_t i = 0; i < capacity; ++i) {
      if (is_empty(table[i])) continue;
      table[i].value.~V();
      table[i].key.~K();
    }
    if (table != nullptr) zx_realloc(block_of(table), 0);
    table = nullptr;
    capacity = count = 0;
    mask = 0;
  }

  // Grows a table that is filled to four fifths, to `wanted` slots (32 at
  // least) if that is more than it has, else to the next of its sizes.
  // Beyond 32 bits of bytes: message 2201.
  void grow(std::int32_t wanted) {
    if (std::int64_t{count} + count / 4 < capacity) return;
    const std::int64_t size = next_size(wanted);
    if (size >= k_limit) return bail_code(2201);
    rehash(static_cast<std::int32_t>(size));
  }

  // ---- iteration over the entries, by slot
  template <class Value>
  struct EntryRef {
    const K& key;
    Value& value;
  };

  template <class Value>
  class Iterator;
  using iterator = Iterator<V>;
  using const_iterator = Iterator<const V>;

  iterator begin() & { return {table, capacity, 0}; }
  iterator end() & { return {table, capacity, capacity}; }
  const_iterator begin() const& { return {table, capacity, 0}; }
  const_iterator end() const& { return {table, capacity, capacity}; }

 protected:
  using Traits = zxKeyTraits<K>;

  struct Entry {
    K key;
    V value;
  };

  // Where a key is, or where the index would note it.
  struct Place {
    Entry* entry;  // null if the key is not there
    zxaa_impl::Cell* cell;
    std::uint32_t hash;  // the one that the index goes by
  };

  // The place of the key for which `matches` holds.  A table without a free
  // slot that does not have the key is message 2206.  There must be a slot.
  template <class Matches>
  Place place_by(std::uint32_t hash, Matches matches) const {
    zxaa_impl::Cell* cell = header().index.find(
        hash, [&](std::int32_t slot) { return matches(table[slot].key); });
    if (cell != nullptr && cell->slot_above != 0) [[likely]]
      return {&table[cell->slot_above - 1], cell, hash};
    if (cell == nullptr || count >= capacity) [[unlikely]] {
      bail_code(2206);
      cell = nullptr;
    }
    return {nullptr, cell, hash};
  }

 private:
  using Header = zxaa_impl::Header;
  using Cell = zxaa_impl::Cell;
  using Index = zxaa_impl::Index;
  using SlotMap = zxaa_impl::SlotMap;

  static_assert(alignof(Entry) <= alignof(Header));

  static constexpr std::int64_t k_byte_limit = 0xFFFFFFFF / sizeof(Entry);
  static constexpr std::int64_t k_limit =
      k_byte_limit > INT32_MAX ? INT32_MAX : k_byte_limit;
  static constexpr std::int32_t k_first_size = 64;
  static constexpr std::int32_t k_step = 1024;  // beyond this, growth by it

  bool check() const {
    return ZX_ASSERT((capacity == 0 && count == 0) ||
                     (table != nullptr && count >= 0 && count <= capacity &&
                      (mask == 0 || mask == capacity - 1)));
  }

  bool check_with(const K& key) const {
    return check() && ZX_ASSERT(!Traits::is_null(key));
  }

  static bool is_empty(const Entry& entry) {
    return Traits::is_null(entry.key);
  }

  static std::uint32_t find_hash(const K& key) {
    if constexpr (requires { Traits::find_hash(key); })
      return Traits::find_hash(key);
    else
      return zxaa_impl::mixed(Traits::hash(key), 0);
  }

  // ---- the block

  static void* block_of(Entry* entries) {
    return reinterpret_cast<char*>(entries) - sizeof(Header);
  }
  Header& header() const { return *static_cast<Header*>(block_of(table)); }

  // The parts of the block in their order, each padded to eight bytes.
  struct Layout {
    std::uint64_t cells, homes, map, end;

    explicit Layout(std::int32_t slots) {
      const auto n = static_cast<std::uint64_t>(slots);
      cells = sizeof(Header) + padded(n * sizeof(Entry));
      homes = cells + Index::cell_count(slots) * sizeof(Cell);
      map = homes + padded(n * sizeof(std::uint32_t));
      end = map + SlotMap::word_count(slots) * sizeof(std::uint64_t);
    }
    static std::uint64_t padded(std::uint64_t bytes) {
      return (bytes + 7) & ~std::uint64_t{7};
    }
  };

  // ---- slots

  std::int32_t home_of(std::uint32_t hash) const {
    const auto home = mask != 0 ? hash & static_cast<std::uint32_t>(mask)
                                : hash % static_cast<std::uint32_t>(capacity);
    return static_cast<std::int32_t>(home);
  }

  Place place_of(const K& key) const {
    if (capacity == 0) return {};  // not worth hashing the key
    return place_by(find_hash(key), [&](const K& k) { return k == key; });
  }

  Entry* find_entry(const K& key) {
    return check_with(key) ? place_of(key).entry : nullptr;
  }

  // Makes the key's entry, but for its value, in the first free slot from its
  // home on; null, and nothing is made, if there is none.
  Entry* take_slot(const Place& place, const K& key) {
    if (place.cell == nullptr) return nullptr;
    const std::uint32_t hash = Traits::hash(key);
    const std::int32_t slot = header().map.first_free(home_of(hash));
    if (slot < 0) {
      bail_code(2206);
      return nullptr;
    }
    header().map.take(slot);
    header().homes[slot] = hash;
    *place.cell = {place.hash, slot + 1};
    ::new (static_cast<void*>(&table[slot].key)) K(key);
    ++count;
    return &table[slot];
  }

  // ---- growth

  std::int64_t next_size(std::int32_t wanted) const {
    constexpr std::int32_t k_least = 32;
    if (wanted != 0 && wanted < k_least) wanted = k_least;
    if (wanted > capacity) return wanted;
    std::int64_t size = std::int64_t{capacity} * 2;
    if (size < k_first_size) size = k_first_size;
    return size > k_step ? std::int64_t{capacity} + k_step : size;
  }

  void rehash(std::int32_t size) {
    const Layout layout(size);
    if (layout.end > SIZE_MAX) return bail_code(2201);
    Entry* const old_table = table;
    const std::int32_t old_capacity = capacity;
    take_block(layout, size);
    if (old_table == nullptr) return;
    Header& old = *static_cast<Header*>(block_of(old_table));
    // In place of each home the new slot is noted, for the index.
    for (std::int32_t i = 0; i < old_capacity; ++i)
      if (!is_empty(old_table[i]))
        old.homes[i] = move_in(old_table[i], old.homes[i]);
    header().index.take_over(old.index, old.homes);
    zx_realloc(&old, 0);
  }

  void take_block(const Layout& layout, std::int32_t size) {
    const auto bytes = static_cast<std::size_t>(layout.end);
    char* block = static_cast<char*>(zx_realloc(nullptr, bytes));
    std::memset(block, 0, bytes);  // all keys null
    auto at = [block](std::uint64_t offset) {
      return static_cast<void*>(block + static_cast<std::size_t>(offset));
    };
    ::new (block)
        Header{Index(static_cast<Cell*>(at(layout.cells)), size),
               SlotMap(static_cast<std::uint64_t*>(at(layout.map)), size),
               static_cast<std::uint32_t*>(at(layout.homes))};
    table = static_cast<Entry*>(at(sizeof(Header)));
    capacity = size;
    mask = (size & (size - 1)) == 0 ? size - 1 : 0;
  }

  // Moves an entry of the old block in; its slot.
  std::uint32_t move_in(const Entry& entry, std::uint32_t hash) {
    const std::int32_t slot = header().map.first_free(home_of(hash));
    header().map.take(slot);
    header().homes[slot] = hash;
    move_entry(table[slot], entry);
    return static_cast<std::uint32_t>(slot);
  }

  static void move_entry(Entry& to, const Entry& from) {
    std::memcpy(static_cast<void*>(&to), static_cast<const void*>(&from),
                sizeof(Entry));
  }

  // ---- removal

  std::int32_t next_slot(std::int32_t i) const {
    return i + 1 == capacity ? 0 : i + 1;
  }

  // Moves later entries of the run into the hole that a removal left, as far
  // as their walks from home would otherwise end at it.
  void close_gap(std::int32_t hole) {
    std::memset(static_cast<void*>(&table[hole]), 0, sizeof(Entry));
    for (std::int32_t i = next_slot(hole); i != hole && !is_empty(table[i]);
         i = next_slot(i)) {
      const std::int32_t home = home_of(header().homes[i]);
      const bool passes_hole =
          i > hole ? home <= hole || home > i : home <= hole && home > i;
      if (!passes_hole) continue;
      header().index.move(find_hash(table[i].key), i, hole);
      header().homes[hole] = header().homes[i];
      move_entry(table[hole], table[i]);
      std::memset(static_cast<void*>(&table[i]), 0, sizeof(Entry));
      hole = i;
    }
    header().map.free(hole);
  }

  Entry* table = nullptr;     // `capacity` entries; null if that is 0
  std::int32_t capacity = 0;  // slots
  std::int32_t count = 0;     // occupied slots
  std::int32_t mask = 0;      // capacity - 1 for a power of two, else 0
};

// Walks the occupied slots.  Like references to values it lasts until the
// next insertion or removal.
template <class K, class V>
template <class Value>
class zxAA<K, V>::Iterator {
 public:
  using iterator_category = std::input_iterator_tag;
  using iterator_concept = std::forward_iterator_tag;
  using difference_type = std::ptrdiff_t;
  using value_type = EntryRef<Value>;
  using reference = EntryRef<Value>;
  using pointer = void;

  Iterator() = default;

  reference operator*() const { return {table[at].key, table[at].value}; }

  // The slot of the entry.
  std::int32_t slot() const { return at; }

  Iterator& operator++() {
    ++at;
    skip_empty();
    return *this;
  }
  Iterator operator++(int) {
    Iterator old = *this;
    ++*this;
    return old;
  }
  friend bool operator==(const Iterator& a, const Iterator& b) {
    return a.at == b.at;
  }

 private:
  friend zxAA;
  Iterator(Entry* entries, std::int32_t slots, std::int32_t start)
      : table(entries), end(slots), at(start) {
    skip_empty();
  }
  void skip_empty() {
    while (at < end && is_empty(table[at])) ++at;
  }

  Entry* table = nullptr;
  std::int32_t end = 0;
  std::int32_t at = 0;
};

// The table with string keys.
template <class V>
class zxSA : public zxAA<zxStr, V> {
  using Base = zxAA<zxStr, V>;

 public:
  using Base::find;

  // The value of a key given as plain text, or null; no string is built.
  V* find(const char* key) {
    if (!ZX_ASSERT(key != nullptr)) return nullptr;
    if (Base::slots() == 0) return nullptr;
    const std::string_view text(key);
    const auto place =
        Base::place_by(zxaa_impl::hash_of_bytes(text.data(), text.size()),
                       [&](const zxStr& k) { return k.view() == text; });
    return place.entry ? &place.entry->value : nullptr;
  }
  const V* find(const char* key) const {
    return const_cast<zxSA*>(this)->find(key);
  }

  // As in zxAA, also for plain text.
  template <class Key>
  const V& get(const Key& key) const {
    const V* value = find(key);
    return value ? *value : zx_empty_value<V>;
  }
  template <class Key>
  bool contains(const Key& key) const {
    return find(key) != nullptr;
  }

  // The value; a key that is not there: message 2203 with the key.
  template <class Key>
  V& at(const Key& key) {
    V* value = find(key);
    if (value != nullptr) return *value;
    bail_code(2203, key);
    return zx_scratch_value<V>();
  }
};

#endif  // ZXAA_H
