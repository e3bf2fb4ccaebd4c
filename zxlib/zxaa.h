// zxaa.h - zxAA<K,V>, a hash table with open addressing, and zxSA<V>, its
// form with string keys, which looks up plain text without building a
// string.
//
// Entries lie inline in one block, without nodes or tombstones.  A new entry
// takes the first free slot from its home slot on, which the key's hash
// gives; iteration goes by slot, so its order follows the hash, and any growth
// or removal changes it.  (How look-ups go without slots, and when the order
// is worked out, is told in zxaa_impl.h.)
//
// Capacities go 64, 128 ... 1024 and on in steps of 1024; the table grows
// when it is filled to four fifths.  ref() grows ahead of its insertion,
// also when the key is there already; set() grows behind it.
//
// References to keys and values last until the next set(), ref(), erase() or
// grow(), so t.ref(a) = t.get(b) is the caller's fault; the arguments of these
// operations themselves may lie in the table.
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

// hash() decides the home slot, and with it the order of entries.  A key
// type with a cheap hash of good quality can offer it as find_hash(), which
// look-ups then use; and a comparison better than == as same().
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
  static bool same(const zxStr& key, std::string_view text) {
    return zx_size(key.length()) == text.size() &&
           zxaa_impl::same_bytes(key.c_str(), text.data(), text.size());
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
    return value ? *value : zx_empty_value<V>();
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
    if (!is_filled()) return ref_in_room(key);
    const K kept(key);  // the block may move under `key`
    grow(0);
    return ref_in_room(kept);
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
    Entry* entry = add_entry(place, key);
    if (entry == nullptr) return;
    ::new (static_cast<void*>(&entry->value)) V(value);
    grow(0);
  }

  // Removes a key; one that is not there: message 2204.
  void erase(const K& key) {
    if (!check_with(key)) return;
    const Place place = place_of(key);
    if (place.entry == nullptr) return bail_code(2204);
    const auto number = static_cast<std::int32_t>(place.entry - table);
    work_out_order();
    header().order.remove(number);
    header().index.remove(place.cell);
    destroy(*place.entry);
    if (number != count - 1) move_last_to(number);
    --count;
  }

  // Empties the table and gives its block back.
  void clear() {
    for (std::int32_t i = 0; i < count; ++i) destroy(table[i]);
    if (table != nullptr) zx_realloc(&header(), 0);
    table = nullptr;
    capacity = count = 0;
    mask = 0;
  }

  // Grows a table that is filled to four fifths, to `wanted` slots (32 at
  // least) if that is more than it has, else to the next of its sizes.
  // Beyond 32 bits of bytes: message 2201.
  void grow(std::int32_t wanted) {
    if (!is_filled()) return;
    const std::int64_t size = next_size(wanted);
    if (size >= k_limit) return bail_code(2201);
    resize(static_cast<std::int32_t>(size));
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

  iterator begin() & { return {table, slots_in_order(), capacity, 0}; }
  iterator end() & { return {table, nullptr, capacity, capacity}; }
  const_iterator begin() const& {
    return {table, slots_in_order(), capacity, 0};
  }
  const_iterator end() const& { return {table, nullptr, capacity, capacity}; }
  const_iterator begin() const&& = delete;
  const_iterator end() const&& = delete;

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
        hash, [&](std::int32_t entry) { return matches(table[entry].key); });
    if (cell != nullptr && cell->entry_above != 0) [[likely]]
      return {&table[cell->entry_above - 1], cell, hash};
    if (cell == nullptr || count >= capacity) [[unlikely]] {
      bail_code(2206);
      cell = nullptr;
    }
    return {nullptr, cell, hash};
  }

 private:
  using Header = zxaa_impl::Header;
  using Layout = zxaa_impl::Layout;

  static_assert(alignof(Entry) <= alignof(Header));

  static constexpr std::int64_t k_byte_limit = 0xFFFFFFFF / sizeof(Entry);
  static constexpr std::int64_t k_count_limit = std::int64_t{INT32_MAX} + 1;
  static constexpr std::int64_t k_limit =
      k_byte_limit > k_count_limit ? k_count_limit : k_byte_limit;
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

  static std::uint32_t find_hash(const K& key) {
    if constexpr (requires { Traits::find_hash(key); })
      return Traits::find_hash(key);
    else
      return zxaa_impl::mixed(Traits::hash(key), 0);
  }

  // ---- entries

  Header& header() const { return reinterpret_cast<Header*>(table)[-1]; }

  Place place_of(const K& key) const {
    if (capacity == 0) return {};  // not worth hashing the key
    return place_by(find_hash(key), [&](const K& k) {
      if constexpr (requires { Traits::same(k, key); })
        return Traits::same(k, key);
      else
        return k == key;
    });
  }

  Entry* find_entry(const K& key) {
    return check_with(key) ? place_of(key).entry : nullptr;
  }

  // Makes the key's entry, but for its value; null, and nothing is made, if
  // there is no slot for it.
  Entry* add_entry(const Place& place, const K& key) {
    if (place.cell == nullptr) return nullptr;
    Header& h = header();
    if (h.ordered && !h.order.add(count, Traits::hash(key))) {
      bail_code(2206);
      return nullptr;
    }
    *place.cell = {place.hash, count + 1};
    ::new (static_cast<void*>(&table[count].key)) K(key);
    return &table[count++];
  }

  static void destroy(Entry& entry) {
    entry.value.~V();
    entry.key.~K();
  }

  // Closes the gap that a removal left among the entries.
  void move_last_to(std::int32_t number) {
    const std::int32_t last = count - 1;
    header().index.renumber(find_hash(table[last].key), last, number);
    header().order.renumber(last, number);
    std::memcpy(static_cast<void*>(&table[number]),
                static_cast<const void*>(&table[last]), sizeof(Entry));
  }

  // ---- the order of slots

  const std::int32_t* slots_in_order() const {
    if (capacity == 0) return nullptr;
    work_out_order();
    return header().order.slots();
  }

  // Goes through the growths again, and between them through the arrivals.
  void work_out_order() const {
    Header& h = header();
    if (h.ordered) return;
    h.ordered = true;
    h.order.start(h.log[0].slots);
    std::int32_t arrived = 0;
    for (std::int32_t i = 1; i < h.growths; ++i) {
      arrived = let_arrive(arrived, h.log[i].entries);
      h.order.grow(h.log[i].slots);
    }
    let_arrive(arrived, count);
  }

  std::int32_t let_arrive(std::int32_t entry, std::int32_t end) const {
    for (; entry < end; ++entry)
      header().order.add(entry, Traits::hash(table[entry].key));
    return entry;
  }

  V& ref_in_room(const K& key) {
    const Place place = place_of(key);
    if (place.entry != nullptr) return place.entry->value;
    Entry* entry = add_entry(place, key);
    if (entry == nullptr) return zx_scratch_value<V>();
    return *::new (static_cast<void*>(&entry->value)) V();
  }

  // ---- growth

  // True if the table is to grow: it is filled to four fifths.
  bool is_filled() const { return std::int64_t{count} + count / 4 >= capacity; }

  std::int64_t next_size(std::int32_t wanted) const {
    constexpr std::int32_t k_least = 32;
    if (wanted != 0 && wanted < k_least) wanted = k_least;
    if (wanted > capacity) return wanted;
    std::int64_t size = std::int64_t{capacity} * 2;
    if (size < k_first_size) size = k_first_size;
    return size > k_step ? std::int64_t{capacity} + k_step : size;
  }

  void resize(std::int32_t size) {
    if (table == nullptr || size > header().room) {
      if (!make_room(size)) return;
    }
    Header& h = header();
    if (h.growths == Layout::log_room(h.room)) work_out_order();
    if (h.ordered)
      h.order.grow(size);
    else
      h.log[h.growths++] = {count, size};
    capacity = size;
    mask = static_cast<std::int32_t>(
        zxaa_impl::mask_of(static_cast<std::uint32_t>(size)));
  }

  // Moves to a block with room for `size` slots, or for twice as many as so
  // far: the steps by which tables grow are too small to move each time.
  // False, and nothing is done, if there is no such block.
  bool make_room(std::int32_t size) {
    std::int64_t room = table != nullptr ? 2 * std::int64_t{header().room} : 0;
    if (room < size || room >= k_limit) room = size;
    Layout layout(static_cast<std::int32_t>(room), sizeof(Entry));
    if (layout.bytes() > SIZE_MAX) layout = Layout(size, sizeof(Entry));
    // What does not fit an address is asked for as what nobody has.
    void* memory =
        zx_realloc(nullptr, layout.bytes() > SIZE_MAX
                                ? SIZE_MAX
                                : static_cast<std::size_t>(layout.bytes()));
    if (memory == nullptr) return false;
    Header* fresh = layout.make_header(memory);
    if (table != nullptr) {
      fresh->take_over(header());
      std::memcpy(static_cast<void*>(fresh + 1),
                  static_cast<const void*>(table),
                  zx_size(count) * sizeof(Entry));
      zx_realloc(&header(), 0);
    }
    table = reinterpret_cast<Entry*>(fresh + 1);
    return true;
  }

  Entry* table = nullptr;     // the entries; null if `capacity` is 0
  std::int32_t capacity = 0;  // slots
  std::int32_t count = 0;     // occupied slots
  std::int32_t mask = 0;      // capacity - 1 for a power of two, else 0
};

// Walks the occupied slots.  It lasts as long as references to values do.
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

  reference operator*() const {
    Entry& entry = table[slots[at] - 1];
    return {entry.key, entry.value};
  }

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
  Iterator(Entry* entries, const std::int32_t* entries_above,
           std::int32_t slot_count, std::int32_t start)
      : table(entries), slots(entries_above), end(slot_count), at(start) {
    skip_empty();
  }
  void skip_empty() {
    while (at < end && slots[at] == 0) ++at;
  }

  Entry* table = nullptr;
  const std::int32_t* slots = nullptr;  // by slot the entry plus one, or 0
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
    const auto place = Base::place_by(
        zxaa_impl::hash_of_bytes(text.data(), text.size()),
        [&](const zxStr& k) { return Base::Traits::same(k, text); });
    return place.entry ? &place.entry->value : nullptr;
  }
  const V* find(const char* key) const {
    return const_cast<zxSA*>(this)->find(key);
  }

  // As in zxAA, also for plain text.
  template <class Key>
  const V& get(const Key& key) const {
    const V* value = find(key);
    return value ? *value : zx_empty_value<V>();
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
