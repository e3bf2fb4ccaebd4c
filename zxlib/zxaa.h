// zxaa.h - zxAA<K,V>, a hash table with open addressing, and zxSA<V>, its
// form with string keys, which looks up plain text without building a
// string.
//
// Entries lie inline in one block, without nodes or tombstones.  Slots are
// walked in order from an entry's home slot, and iteration goes by slot, so
// its order follows the hash; any growth or removal changes it.
//
// Capacities go 64, 128 ... 1024 and on in steps of 1024; the table grows
// when it is filled to four fifths.  ref() grows ahead of its insertion,
// also when the key is there already; set() grows behind it.
//
// References to values last until the next insertion or removal, so
// t.ref(a) = t.get(b) is the caller's fault; t.set(a, t.get(b)) is safe.
//
// A key type says by zxKeyTraits<K> which key is null (its slot is empty; it
// may not be used) and how a key hashes.  For strings the null key is the
// null representation, never seen in a live string: "" is an ordinary key.
#ifndef ZXAA_H
#define ZXAA_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>

#include "zxatsys.h"
#include "zxmisc.h"
#include "zxqva.h"
#include "zxstr.h"

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

  // The value for writing; a new key gets a default value first.
  V& ref(const K& key) {
    if (!check_with(key)) return zx_scratch_value<V>();
    grow(0);
    Entry* entry = probe(key);
    if (entry == nullptr) return zx_scratch_value<V>();
    if (is_empty(*entry)) {
      ::new (static_cast<void*>(&entry->value)) V();
      take_slot(entry, key);
    }
    return entry->value;
  }

  // Inserts or overwrites.
  void set(const K& key, const V& value) {
    if (!check_with(key)) return;
    if (capacity == 0) grow(0);
    Entry* entry = probe(key);
    if (entry == nullptr) return;
    if (!is_empty(*entry)) {
      entry->value = value;
      return;
    }
    ::new (static_cast<void*>(&entry->value)) V(value);
    take_slot(entry, key);
    grow(0);
  }

  // Removes a key; one that is not there: message 2204.
  void erase(const K& key) {
    if (!check_with(key)) return;
    Entry* entry = find_entry(key);
    if (entry == nullptr) return bail_code(2204);
    entry->value.~V();
    entry->key.~K();
    --count;
    close_gap(static_cast<std::int32_t>(entry - table));
  }

  // Empties the table and gives its block back.
  void clear() {
    for (std::int32_t i = 0; i < capacity; ++i) {
      if (is_empty(table[i])) continue;
      table[i].value.~V();
      table[i].key.~K();
    }
    if (table != nullptr) zx_realloc(table, 0);
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

 protected:
  using Traits = zxKeyTraits<K>;

  struct Entry {
    K key;
    V value;
  };

  // True if the slot is free.
  static bool is_empty(const Entry& entry) {
    return Traits::is_null(entry.key);
  }

  // The entry for which `matches` holds, or the free slot at which the walk
  // from the hash's home slot ended; null if the table is full of others
  // (message 2206).  There must be a slot.
  template <class Matches>
  Entry* walk(std::uint32_t hash, Matches matches) const {
    bool wrapped = false;
    for (std::int32_t i = home_of(hash, capacity, mask);; ++i) {
      if (i == capacity) {
        if (wrapped) break;
        wrapped = true;
        i = 0;
      }
      if (is_empty(table[i]) || matches(table[i].key)) return &table[i];
    }
    bail_code(2206);
    return nullptr;
  }

 private:
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

  static std::int32_t home_of(std::uint32_t hash, std::int32_t slots,
                              std::int32_t slot_mask) {
    const auto home = slot_mask != 0
                          ? hash & static_cast<std::uint32_t>(slot_mask)
                          : hash % static_cast<std::uint32_t>(slots);
    return static_cast<std::int32_t>(home);
  }

  std::int32_t home_of(const K& key) const {
    return home_of(Traits::hash(key), capacity, mask);
  }

  Entry* probe(const K& key) const {
    if (capacity == 0) return nullptr;  // not worth hashing the key
    return walk(Traits::hash(key), [&](const K& k) { return k == key; });
  }

  Entry* find_entry(const K& key) {
    if (!check_with(key)) return nullptr;
    Entry* entry = probe(key);
    return entry == nullptr || is_empty(*entry) ? nullptr : entry;
  }

  void take_slot(Entry* entry, const K& key) {
    ::new (static_cast<void*>(&entry->key)) K(key);
    ++count;
  }

  std::int64_t next_size(std::int32_t wanted) const {
    constexpr std::int32_t k_least = 32;
    if (wanted != 0 && wanted < k_least) wanted = k_least;
    if (wanted > capacity) return wanted;
    std::int64_t size = std::int64_t{capacity} * 2;
    if (size < k_first_size) size = k_first_size;
    return size > k_step ? std::int64_t{capacity} + k_step : size;
  }

  void rehash(std::int32_t size) {
    Entry* old_table = table;
    const std::int32_t old_capacity = capacity;
    const std::size_t bytes = zx_size(size) * sizeof(Entry);
    table = static_cast<Entry*>(zx_realloc(nullptr, bytes));
    std::memset(static_cast<void*>(table), 0, bytes);  // all keys null
    capacity = size;
    mask = (size & (size - 1)) == 0 ? size - 1 : 0;
    for (std::int32_t i = 0; i < old_capacity; ++i)
      if (!is_empty(old_table[i])) move_in(old_table[i]);
    if (old_table != nullptr) zx_realloc(old_table, 0);
  }

  void move_in(const Entry& entry) {
    std::int32_t i = home_of(entry.key);
    while (!is_empty(table[i])) i = next_slot(i);
    move_entry(table[i], entry);
  }

  static void move_entry(Entry& to, const Entry& from) {
    std::memcpy(static_cast<void*>(&to), static_cast<const void*>(&from),
                sizeof(Entry));
  }

  std::int32_t next_slot(std::int32_t i) const {
    return i + 1 == capacity ? 0 : i + 1;
  }

  // Moves later entries of the run into the hole that a removal left, as far
  // as their walks would otherwise end at it.
  void close_gap(std::int32_t hole) {
    for (std::int32_t i = next_slot(hole); i != hole && !is_empty(table[i]);
         i = next_slot(i)) {
      const std::int32_t home = home_of(table[i].key);
      const bool passes_hole =
          i > hole ? home <= hole || home > i : home <= hole && home > i;
      if (!passes_hole) continue;
      move_entry(table[hole], table[i]);
      hole = i;
    }
    std::memset(static_cast<void*>(&table[hole]), 0, sizeof(Entry));
  }

  Entry* table = nullptr;     // `capacity` entries; null if that is 0
  std::int32_t capacity = 0;  // slots
  std::int32_t count = 0;     // occupied slots
  std::int32_t mask = 0;      // capacity - 1 for a power of two, else 0
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
    auto* entry = Base::walk(crc16(text.data(), text.size()),
                             [&](const zxStr& k) { return k.view() == text; });
    return entry == nullptr || Base::is_empty(*entry) ? nullptr : &entry->value;
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
