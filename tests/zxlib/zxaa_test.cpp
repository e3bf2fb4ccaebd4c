// zxaa_test.cpp - tests of zxlib/zxaa.h, zxaa_impl.h and zxaa.cpp: the hash
// table, its form with string keys, and the parts beside the entries.

#include "zxaa.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <climits>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <functional>
#include <iterator>
#include <map>
#include <memory>
#include <numeric>
#include <optional>
#include <random>
#include <ranges>
#include <string>
#include <string_view>
#include <type_traits>
#include <unordered_map>
#include <utility>
#include <vector>

#include "kit/counted.h"
#include "kit/failure.h"
#include "zxstr.h"

namespace {

struct Here;
using Counted = kit::Counted<Here>;
using namespace std::string_literals;
using namespace std::string_view_literals;

// A key that is its own hash, so that a test chooses the home slots.
struct PlainKey {
  std::int32_t number = 0;

  friend bool operator==(PlainKey a, PlainKey b) {
    return a.number == b.number;
  }
};
int hashes_taken = 0;

}  // namespace

template <>
struct zxKeyTraits<PlainKey> {
  static bool is_null(PlainKey key) { return key.number == 0; }
  static std::uint32_t hash(PlainKey key) {
    ++hashes_taken;
    return static_cast<std::uint32_t>(key.number);
  }
};

namespace {

using Plain = zxAA<PlainKey, std::int32_t>;
using Strings = zxSA<std::int32_t>;

PlainKey key(std::int32_t number) { return PlainKey{number}; }

// ---------------------------------------------------- a look at the slots --

// The four fields as they lie in the object.
struct Fields {
  char* table;
  std::int32_t capacity;
  std::int32_t count;
  std::uint32_t mask;
};
static_assert(sizeof(Plain) == sizeof(Fields));
static_assert(sizeof(Strings) == sizeof(Fields));

template <class Table>
Fields fields_of(const Table& table) {
  Fields fields;
  std::memcpy(&fields, static_cast<const void*>(&table), sizeof fields);
  return fields;
}

template <class Table>
void set_fields(Table& table, const Fields& fields) {
  std::memcpy(static_cast<void*>(&table), &fields, sizeof fields);
}

// An occupied slot: the key and then the value, side by side.
using Slot = std::optional<std::pair<std::string, std::int32_t>>;
using Slots = std::vector<Slot>;

std::string name_of(std::int32_t number) { return std::to_string(number); }
std::string name_of(PlainKey key) { return std::to_string(key.number); }
std::string name_of(const zxStr& key) { return std::string(key.view()); }

// By the iteration, which goes from slot to slot.
template <class Table>
Slots slots_of(const Table& table) {
  Slots slots(zx_size(table.slots()));
  for (auto at = table.begin(); at != table.end(); ++at)
    slots.at(zx_size(at.slot())) = std::pair(name_of((*at).key), (*at).value);
  return slots;
}

// The slot in which a key lies, or -1.
int slot_of(const Plain& table, std::int32_t number) {
  const Slots slots = slots_of(table);
  for (std::size_t i = 0; i < slots.size(); ++i)
    if (slots[i] && slots[i]->first == std::to_string(number))
      return static_cast<int>(i);
  return -1;
}

// "capacity count mask".
template <class Table>
std::string shape_of(const Table& table) {
  const Fields f = fields_of(table);
  return std::to_string(f.capacity) + " " + std::to_string(f.count) + " " +
         std::to_string(f.mask);
}

// The rules of the table, told slot by slot with plain numbers.
class Model {
 public:
  explicit Model(std::function<std::uint32_t(const std::string&)> hash_of)
      : hash(std::move(hash_of)) {}

  Slots slots;
  int count = 0;

  int capacity() const { return static_cast<int>(slots.size()); }
  std::uint32_t mask() const {
    const unsigned size = static_cast<unsigned>(capacity());
    return (size & (size - 1)) == 0 && size > 0 ? size - 1 : 0;
  }

  void grow(int wanted) {
    if (count + count / 4 < capacity()) return;
    if (wanted != 0 && wanted < 32) wanted = 32;
    if (wanted <= capacity()) {
      wanted = std::max(capacity() * 2, 64);
      if (wanted > 1024) wanted = capacity() + 1024;
    }
    Slots old(static_cast<std::size_t>(wanted));
    old.swap(slots);
    for (Slot& slot : old)
      if (slot) at(probe(slot->first)) = slot;
  }
  void ref(const std::string& k, std::int32_t value) {
    grow(0);
    store(k, value);
  }
  void set(const std::string& k, std::int32_t value) {
    if (capacity() == 0) grow(0);
    if (store(k, value)) grow(0);
  }
  void erase(const std::string& k) {
    int hole = probe(k);
    at(hole).reset();
    for (int next = after(hole); at(next); next = after(next)) {
      const int home = home_of(at(next)->first);
      const bool moves = (next > hole && (home <= hole || home > next)) ||
                         (next < hole && home <= hole && home > next);
      if (!moves) continue;
      at(hole) = at(next);
      at(next).reset();
      hole = next;
    }
    --count;
  }
  int home_of(const std::string& k) const {
    return static_cast<int>(hash(k) % static_cast<unsigned>(capacity()));
  }

 private:
  int after(int i) const { return (i + 1) % capacity(); }
  Slot& at(int i) { return slots[static_cast<std::size_t>(i)]; }
  // The slot of the key, or the empty one at which the search for it ends.
  int probe(const std::string& k) {
    int i = home_of(k);
    while (at(i) && at(i)->first != k) i = after(i);
    return i;
  }
  // True if the key is new.
  bool store(const std::string& k, std::int32_t value) {
    Slot& slot = at(probe(k));
    const bool is_new = !slot;
    slot = std::pair(k, value);
    count += is_new;
    return is_new;
  }

  std::function<std::uint32_t(const std::string&)> hash;
};

std::uint32_t hash_of_number(const std::string& name) {
  return static_cast<std::uint32_t>(std::stol(name));
}

std::uint32_t hash_of_text(const std::string& name) {
  return crc16(name.data(), name.size());
}

template <class Table>
void expect_same(const Table& table, const Model& model) {
  ASSERT_EQ(table.length(), model.count);
  ASSERT_EQ(table.slots(), model.capacity());
  ASSERT_EQ(fields_of(table).mask, model.mask());
  ASSERT_TRUE(slots_of(table) == model.slots);
}

// -------------------------------------------------------------- the start --

TEST(zxaa, a_table_starts_with_all_fields_zero_and_no_block) {
  constinit static Plain process_wide;
  const Plain table;
  for (const Fields& f : {fields_of(table), fields_of(process_wide)}) {
    EXPECT_EQ(f.table, nullptr);
    EXPECT_EQ(f.capacity, 0);
    EXPECT_EQ(f.count, 0);
    EXPECT_EQ(f.mask, 0U);
  }
}

TEST(zxaa, lookups_in_an_empty_table_find_nothing_without_hashing) {
  Plain table;
  hashes_taken = 0;
  std::int32_t* value = nullptr;
  EXPECT_EQ(table.find(key(5)), nullptr);
  EXPECT_EQ(std::as_const(table).find(key(5)), nullptr);
  EXPECT_FALSE(table.lookup(key(5), value));
  EXPECT_EQ(value, nullptr);
  EXPECT_FALSE(table.contains(key(5)));
  EXPECT_EQ(table.get(key(5)), 0);
  EXPECT_EQ(hashes_taken, 0);
  EXPECT_EQ(table.slots(), 0);
}

TEST(zxaa, a_table_is_not_copied) {
  static_assert(!std::is_copy_constructible_v<Plain>);
  static_assert(!std::is_copy_assignable_v<Plain>);
  static_assert(!std::is_copy_constructible_v<Strings>);
}

// ---------------------------------------------------- finding and storing --

TEST(zxaa, what_was_stored_is_found_in_every_way) {
  Plain table;
  table.set(key(5), 50);
  table.ref(key(6)) = 60;
  EXPECT_EQ(*table.find(key(5)), 50);
  EXPECT_EQ(*std::as_const(table).find(key(6)), 60);
  EXPECT_EQ(table.get(key(6)), 60);
  EXPECT_TRUE(table.contains(key(5)));
  std::int32_t* value = nullptr;
  EXPECT_TRUE(table.lookup(key(5), value));
  EXPECT_EQ(value, table.find(key(5)));
  EXPECT_EQ(table.length(), 2);
  table.set(key(5), 51);
  EXPECT_EQ(table.ref(key(5)), 51);
  *table.find(key(5)) = 52;
  EXPECT_EQ(table.get(key(5)), 52);
  EXPECT_EQ(table.length(), 2);
}

TEST(zxaa, get_of_an_absent_key_inserts_nothing_and_ref_does) {
  Plain table;
  table.set(key(1), 10);
  EXPECT_EQ(table.get(key(2)), 0);
  EXPECT_EQ(table.find(key(2)), nullptr);
  std::int32_t* value = nullptr;
  EXPECT_FALSE(table.lookup(key(2), value));
  EXPECT_EQ(table.length(), 1);
  EXPECT_EQ(table.ref(key(2)), 0);
  EXPECT_EQ(table.length(), 2);
}

TEST(zxaa, entries_of_one_home_follow_each_other_with_wrap) {
  Plain table;
  // All with the home 62 of 64, but for the last, which has 0.
  for (const std::int32_t k : {62, 126, 190, 254}) table.set(key(k), k);
  table.set(key(64), 64);
  const int expected[][2] = {{62, 62}, {126, 63}, {190, 0}, {254, 1}, {64, 2}};
  for (const auto& row : expected) EXPECT_EQ(slot_of(table, row[0]), row[1]);
  for (const std::int32_t k : {62, 126, 190, 254, 64})
    EXPECT_EQ(table.get(key(k)), k);
  EXPECT_FALSE(table.contains(key(318)));  // home 62 too
  EXPECT_FALSE(table.contains(key(-2)));   // and this
}

TEST(zxaa, negative_keys_hash_as_unsigned_numbers) {
  Plain table;
  table.set(key(-1), 1);
  table.set(key(INT_MIN), 2);
  EXPECT_EQ(slot_of(table, -1), 63);
  EXPECT_EQ(slot_of(table, INT_MIN), 0);
  EXPECT_EQ(table.get(key(-1)), 1);
  EXPECT_EQ(table.get(key(INT_MIN)), 2);
}

TEST(zxaa, at_of_an_absent_key_is_message_2202) {
  constexpr auto k_message = "2202: zxaa: no such element";
  constexpr auto k_line = "[2202-2202-0/E-0/E//]";
  Plain table;
  EXPECT_FAILURE(table.at(key(1)), k_message, k_line);  // no block yet
  table.set(key(1), 10);
  EXPECT_EQ(table.at(key(1)), 10);
  table.at(key(1)) = 11;
  EXPECT_EQ(table.get(key(1)), 11);
  EXPECT_FAILURE(table.at(key(2)), k_message, k_line);
  EXPECT_FAILURE(table.at(key(65)), k_message, k_line);
  EXPECT_ASSERTION(table.at(key(0)), "zxaa");
  kit::with_failures_dropped([&] {
    EXPECT_EQ(table.at(key(2)), 0);
    table.at(key(2)) = 5;
    EXPECT_EQ(table.at(key(2)), 0);
  });
  EXPECT_EQ(shape_of(table), "64 1 63");
}

// ---------------------------------------------- whole numbers and pointers --

// Each key alone in a table: its slot is its home, by mask and by mod.
template <class K>
void expect_homes(const std::vector<std::pair<K, std::uint32_t>>& rows) {
  for (const auto& [k, hash] : rows) {
    for (const std::int32_t size : {64, 3072}) {
      SCOPED_TRACE(std::to_string(hash) + " " + std::to_string(size));
      zxAA<K, std::int32_t> table;
      table.grow(size);
      EXPECT_FALSE(table.contains(k));
      table.set(k, 5);
      EXPECT_EQ(table.get(k), 5);
      ASSERT_NE(table.begin(), table.end());
      EXPECT_EQ(zx_size(table.begin().slot()), hash % zx_size(size));
      EXPECT_EQ((*table.begin()).key, k);
      table.erase(k);
      EXPECT_FALSE(table.contains(k));
    }
  }
}

template <class K>
void expect_null_is_zero() {
  zxAA<K, std::int32_t> table;
  EXPECT_ASSERTION(table.find(K{}), "zxaa");
  EXPECT_ASSERTION(table.set(K{}, 1), "zxaa");
  EXPECT_ASSERTION(table.ref(K{}), "zxaa");
  EXPECT_EQ(table.slots(), 0);
}

TEST(zxaa, whole_numbers_hash_as_themselves_cut_to_32_bits) {
  expect_homes<std::int8_t>({{std::int8_t{1}, 1},
                             {std::int8_t{127}, 127},
                             {std::int8_t{-1}, 0xFFFFFFFF},
                             {std::int8_t{-128}, 0xFFFFFF80}});
  expect_homes<std::uint8_t>({{std::uint8_t{255}, 255}});
  expect_homes<std::int16_t>(
      {{std::int16_t{-2}, 0xFFFFFFFE}, {std::int16_t{-32768}, 0xFFFF8000}});
  expect_homes<std::uint16_t>({{std::uint16_t{65535}, 65535}});
  expect_homes<std::int32_t>(
      {{1, 1}, {-1, 0xFFFFFFFF}, {INT_MAX, 0x7FFFFFFF}, {INT_MIN, 0x80000000}});
  expect_homes<std::uint32_t>({{0xFFFFFFFF, 0xFFFFFFFF}});
  expect_homes<std::int64_t>({{5, 5},
                              {-1, 0xFFFFFFFF},
                              {0x100000005, 5},
                              {0x100000000, 0},
                              {INT64_MIN, 0},
                              {-5'000'000'000, 0xD5FA0E00}});
  expect_homes<std::uint64_t>({{0x8000000000000001, 1}});
  expect_homes<char>({{'a', 97}});
  expect_homes<bool>({{true, 1}});
}

TEST(zxaa, zero_is_the_null_key_of_whole_numbers) {
  expect_null_is_zero<std::int8_t>();
  expect_null_is_zero<std::uint16_t>();
  expect_null_is_zero<std::int32_t>();
  expect_null_is_zero<std::int64_t>();
  expect_null_is_zero<std::uint64_t>();
  expect_null_is_zero<bool>();
  expect_null_is_zero<int*>();
  expect_null_is_zero<const char*>();
}

TEST(zxaa, wide_keys_with_the_same_32_bits_are_kept_apart) {
  zxAA<std::int64_t, std::int32_t> table;
  const auto wide = [](std::int64_t i) { return (i << 32) + 7; };
  for (std::int32_t i = 0; i < 40; ++i) table.set(wide(i), i);
  std::int32_t slot = 7;
  for (auto at = table.begin(); at != table.end(); ++at, ++slot) {
    EXPECT_EQ(at.slot(), slot);
    EXPECT_EQ((*at).key, wide(slot - 7));
  }
  for (std::int32_t i = 0; i < 40; i += 2) table.erase(wide(i));
  for (std::int32_t i = 0; i < 40; ++i) {
    ASSERT_EQ(table.contains(wide(i)), i % 2 == 1);
    ASSERT_EQ(table.get(wide(i)), i % 2 == 1 ? i : 0);
  }
}

TEST(zxaa, every_narrow_key_has_a_place) {
  zxAA<std::int8_t, std::int32_t> table;
  for (int i = -128; i < 128; ++i)
    if (i != 0) table.set(static_cast<std::int8_t>(i), i);
  EXPECT_EQ(table.length(), 255);
  for (int i = -128; i < 128; ++i)
    if (i != 0) {
      ASSERT_EQ(table.get(static_cast<std::int8_t>(i)), i);
    }
}

TEST(zxaa, addresses_are_keys) {
  int objects[500];
  zxAA<const int*, std::int32_t> table;
  for (std::int32_t i = 0; i < 500; ++i) table.set(&objects[i], i);
  for (std::int32_t i = 0; i < 500; ++i) ASSERT_EQ(table.get(&objects[i]), i);
  EXPECT_EQ(table.find(objects + 500), nullptr);
  for (std::int32_t i = 0; i < 500; i += 3) table.erase(&objects[i]);
  for (std::int32_t i = 0; i < 500; ++i)
    ASSERT_EQ(table.contains(&objects[i]), i % 3 != 0);
}

// An address out of nowhere, which a table never looks at.
const int* address(std::uint64_t bits) {
  return reinterpret_cast<const int*>(static_cast<std::uintptr_t>(bits));
}

TEST(zxaa, addresses_hash_by_both_of_their_halves) {
  expect_homes<const int*>({{address(0x40), 0x40},
                            {address(0x1234), 0x1234},
                            {address(0x80000001), 0x80000001},
                            {address(0xFFFFFFFF), 0xFFFFFFFF}});
  if (sizeof(void*) == 4) return;
  expect_homes<const int*>({{address(0x100000000), 1},
                            {address(0x100000001), 0},
                            {address(0x7FFF12345678), 0x12342987},
                            {address(0xFFFFFFFF00000000), 0xFFFFFFFF}});
}

// ---------------------------------------------------------------- iterating --

TEST(zxaa, a_loop_gives_keys_and_values_by_their_slots) {
  Plain table;
  Model model(hash_of_number);
  for (const std::int32_t k : {63, 127, 5, 64, -1, 4, 69, 40}) {
    table.set(key(k), k * 10);
    model.set(std::to_string(k), k * 10);
  }
  std::vector<std::pair<std::string, std::int32_t>> expected;
  for (const Slot& slot : model.slots)
    if (slot) expected.push_back(*slot);
  std::vector<std::pair<std::string, std::int32_t>> seen;
  for (auto [k, value] : table) {
    seen.emplace_back(name_of(k), value);
    value += 1;  // the value in the table
  }
  EXPECT_EQ(seen, expected);
  EXPECT_EQ(seen.front().first, "127");  // 63 lies in the last slot
  seen.clear();
  for (const auto [k, value] : std::as_const(table))
    seen.emplace_back(name_of(k), value - 1);
  EXPECT_EQ(seen, expected);
  EXPECT_EQ(table.get(key(5)), 51);

  // Keys are for reading, and so are the values of a constant table.
  using Entry = decltype(*table.begin());
  using ConstEntry = decltype(*std::as_const(table).begin());
  static_assert(std::is_same_v<decltype(Entry::key), const PlainKey&>);
  static_assert(std::is_same_v<decltype(Entry::value), std::int32_t&>);
  static_assert(
      std::is_same_v<decltype(ConstEntry::value), const std::int32_t&>);
}

template <class T>
concept has_begin = requires(T&& t) {
  static_cast<T&&>(t).begin();
};
template <class T>
concept has_end = requires(T&& t) {
  static_cast<T&&>(t).end();
};

TEST(zxaa, a_temporary_is_not_gone_through) {
  static_assert(has_begin<Plain&> && has_begin<const Plain&>);
  static_assert(has_end<Plain&> && has_end<const Plain&>);
  static_assert(!has_begin<Plain> && !has_begin<const Plain>);
  static_assert(!has_end<Plain> && !has_end<const Plain>);
}

TEST(zxaa, an_iterator_tells_the_slot) {
  Plain table;
  for (const std::int32_t k : {62, 126, 190, 7}) table.set(key(k), k);
  std::vector<std::int32_t> slots;
  for (auto at = table.begin(); at != table.end(); ++at)
    slots.push_back(at.slot());
  EXPECT_EQ(slots, (std::vector<std::int32_t>{0, 7, 62, 63}));
  EXPECT_EQ(table.end().slot(), 64);
  auto at = table.begin();
  EXPECT_EQ((*at++).key, key(190));
  EXPECT_EQ((*at).key, key(7));
  const auto copy = at;
  EXPECT_EQ(copy, at);
  EXPECT_NE(++at, copy);
  EXPECT_EQ(copy.slot(), 7);
}

TEST(zxaa, an_empty_table_has_nothing_to_go_through) {
  Plain table;
  EXPECT_EQ(table.begin(), table.end());
  EXPECT_EQ(std::as_const(table).begin(), std::as_const(table).end());
  EXPECT_EQ(table.slots(), 0);
  table.grow(0);
  EXPECT_EQ(table.begin(), table.end());
  table.set(key(1), 1);
  EXPECT_NE(table.begin(), table.end());
  table.erase(key(1));
  EXPECT_EQ(table.begin(), table.end());
  table.set(key(1), 1);
  table.clear();
  EXPECT_EQ(table.begin(), table.end());
  EXPECT_EQ(Plain::iterator(), Plain::iterator());
}

TEST(zxaa, going_through_a_table_moves_nothing) {
  zxSA<zxStr> table;
  for (int i = 0; i < 1000; ++i)
    table.set(zxStr(std::to_string(i)), zxStr(std::to_string(i)));
  const zxStr* value = table.find("500");
  for (int round = 0; round < 3; ++round) {
    int entries = 0;
    for (const auto [name, text] : table) {
      EXPECT_EQ(name, text);
      ++entries;
    }
    EXPECT_EQ(entries, 1000);
    EXPECT_EQ(table.find("500"), value);
    for (auto [name, text] : table)
      if (name == "500") {
        EXPECT_EQ(&text, value);
      }
  }
}

TEST(zxaa, the_algorithms_of_the_standard_work_on_a_table) {
  static_assert(std::forward_iterator<Plain::iterator>);
  static_assert(std::forward_iterator<Strings::const_iterator>);
  static_assert(std::ranges::forward_range<Plain&>);
  static_assert(std::ranges::forward_range<const Strings&>);
  Strings table;
  for (int i = 1; i <= 300; ++i) table.set(zxStr(std::to_string(i)), i);
  const Strings& constant = table;
  EXPECT_EQ(std::distance(table.begin(), table.end()), 300);
  EXPECT_EQ(std::ranges::distance(constant), 300);
  const auto is_even = [](const auto& entry) { return entry.value % 2 == 0; };
  EXPECT_EQ(std::ranges::count_if(constant, is_even), 150);
  EXPECT_EQ(std::count_if(table.begin(), table.end(), is_even), 150);
  std::ranges::for_each(table, [](auto entry) { entry.value *= 2; });
  const auto found = std::ranges::find_if(
      table, [](const auto& entry) { return entry.key == "77"; });
  ASSERT_NE(found, table.end());
  EXPECT_EQ((*found).value, 154);
  EXPECT_TRUE(std::ranges::none_of(
      constant, [](const auto& entry) { return entry.value == 153; }));
  EXPECT_EQ(std::accumulate(
                constant.begin(), constant.end(), 0,
                [](int sum, const auto& entry) { return sum + entry.value; }),
            300 * 301);
}

// ---------------------------------------------------------------- growing --

// A table with the keys 1 to n, stored by set.
void fill(Plain& table, int n) {
  for (int i = 1; i <= n; ++i) table.set(key(i), i);
}

TEST(zxaa, ref_grows_ahead_of_the_53rd_entry) {
  Plain table;
  for (int i = 1; i <= 52; ++i) {
    table.ref(key(i)) = i;
    ASSERT_EQ(table.slots(), 64);
  }
  table.ref(key(53)) = 53;
  EXPECT_EQ(shape_of(table), "128 53 127");
}

TEST(zxaa, ref_grows_for_a_key_that_is_there_too) {
  Plain table;
  for (int i = 1; i <= 52; ++i) table.ref(key(i)) = i;
  ASSERT_EQ(table.slots(), 64);
  EXPECT_EQ(table.ref(key(7)), 7);
  EXPECT_EQ(shape_of(table), "128 52 127");
}

TEST(zxaa, set_grows_behind_the_52nd_entry) {
  Plain table;
  fill(table, 51);
  EXPECT_EQ(shape_of(table), "64 51 63");
  table.set(key(7), 70);  // there already
  EXPECT_EQ(table.slots(), 64);
  table.set(key(52), 52);
  EXPECT_EQ(shape_of(table), "128 52 127");
}

TEST(zxaa, capacities_double_to_1024_and_go_on_by_1024) {
  Plain table;
  std::vector<std::string> shapes;
  for (int i = 1; i <= 5000; ++i) {
    const std::int32_t before = table.slots();
    table.set(key(i), i);
    if (table.slots() != before) shapes.push_back(shape_of(table));
  }
  // The entry behind which count + count/4 reaches the capacity.
  EXPECT_EQ(shapes, (std::vector<std::string>{
                        "64 1 63", "128 52 127", "256 103 255", "512 205 511",
                        "1024 410 1023", "2048 820 2047", "3072 1639 0",
                        "4096 2458 4095", "5120 3277 0", "6144 4096 0",
                        "7168 4916 0"}));
  for (int i = 1; i <= 5000; ++i) ASSERT_EQ(table.get(key(i)), i);
}

TEST(zxaa, the_home_slot_comes_from_the_mask_or_from_mod) {
  const struct {
    int entries;
    int capacity;
  } rows[] = {{10, 64}, {820, 2048}, {1639, 3072}, {2458, 4096}, {3277, 5120}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.capacity);
    Plain table;
    fill(table, row.entries);
    ASSERT_EQ(table.slots(), row.capacity);
    // Homes that are free: the keys 1 to n take the slots 1 to n.
    const int home = row.capacity - 3;
    table.set(key(7 * row.capacity + home), 1);
    EXPECT_EQ(slot_of(table, 7 * row.capacity + home), home);
  }
}

TEST(zxaa, grow_takes_what_is_wanted_of_a_table_that_is_full) {
  const struct {
    int entries;
    int wanted;
    const char* shape;
  } rows[] = {
      {0, 0, "64 0 63"},        {0, 1, "32 0 31"},
      {0, 10, "32 0 31"},       {0, 31, "32 0 31"},
      {0, 32, "32 0 31"},       {0, 33, "33 0 0"},
      {0, 64, "64 0 63"},       {0, 100, "100 0 0"},
      {0, -5, "32 0 31"},       {0, 1500, "1500 0 0"},
      {0, 4096, "4096 0 4095"}, {10, 0, "64 10 63"},  // not full: nothing
      {10, 500, "64 10 63"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.wanted);
    Plain table;
    fill(table, row.entries);
    table.grow(row.wanted);
    EXPECT_EQ(shape_of(table), row.shape);
  }
}

TEST(zxaa, a_table_of_a_wanted_size_grows_by_the_same_rules) {
  const struct {
    int wanted;
    std::vector<int> capacities;
  } rows[] = {
      {10, {32, 64, 128, 256, 512, 1024, 2048}},
      {33, {33, 66, 132, 264, 528, 1552}},  // 1056 is above 1024
      {100, {100, 200, 400, 800, 1824}},
      {600, {600, 1624, 2648}},
      {1500, {1500, 2524}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.wanted);
    Plain table;
    Model model(hash_of_number);
    table.grow(row.wanted);
    model.grow(row.wanted);
    std::vector<int> capacities = {table.slots()};
    for (int i = 1; capacities.size() < row.capacities.size(); ++i) {
      const int k = i * 37;
      table.set(key(k), i);
      model.set(name_of(key(k)), i);
      if (table.slots() != capacities.back())
        capacities.push_back(table.slots());
      ASSERT_LT(i, 5000);
    }
    EXPECT_EQ(capacities, row.capacities);
    expect_same(table, model);
  }
}

struct Value12 {
  std::int32_t words[3] = {};
};
struct Value56 {
  std::int32_t words[14] = {};
};

// Stands in the slot for memory that nobody has.
void* no_memory(void*, std::size_t) {
  bail_code(2000);
  return nullptr;
}

// The largest block of a table is just below 4 GiB.
template <class V>
void expect_limit(std::int32_t limit) {
  SCOPED_TRACE(limit);
  zxAA<PlainKey, V> table;
  const zxReallocFunction old = zx_realloc;
  zx_realloc = no_memory;
  EXPECT_FAILURE(table.grow(limit), "2201: zxaa: tbl too big",
                 "[2201-2201-0/E-0/E//]");
  EXPECT_FAILURE(table.grow(INT_MAX), "2201: zxaa: tbl too big",
                 "[2201-2201-0/E-0/E//]");
  EXPECT_FAILURE(table.grow(limit - 1), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
  zx_realloc = old;
  kit::with_failures_dropped([&] { table.grow(limit); });
  EXPECT_EQ(shape_of(table), "0 0 0");
  table.ref(key(1)) = V();
  EXPECT_EQ(shape_of(table), "64 1 63");
}

TEST(zxaa, blocks_end_below_32_bits_of_bytes) {
  expect_limit<std::int32_t>(0x1FFFFFFF);
  expect_limit<Value12>(0xFFFFFFF);
  expect_limit<Value56>(0x4444444);
}

// What was asked of the slot; 0 for nothing.
std::size_t asked_for = 0;
void* note_and_fail(void*, std::size_t size) {
  asked_for = size;
  bail_code(2000);
  return nullptr;
}

// Whatever the number of slots, the block that is asked for holds them all.
// One that no address can reach is asked for as the largest that there is,
// and never as a small one.
template <class V>
void expect_blocks_of_their_size() {
  constexpr std::uint64_t k_entry = sizeof(PlainKey) + sizeof(V);
  int granted = 0;
  int refused = 0;
  for (double step = 33; step < INT_MAX; step *= 1.05) {
    const auto slots = static_cast<std::int32_t>(step);
    SCOPED_TRACE(slots);
    // The entries, two numbers of 32 bits and a bit for each slot, and cells
    // of eight bytes, half as many again up to a power of two.
    const auto n = static_cast<std::uint64_t>(slots);
    const std::uint64_t least =
        n * (k_entry + 8) + std::bit_ceil(n + n / 2) * 8;
    const std::uint64_t most = least + n / 4 + 4096;
    zxAA<PlainKey, V> table;
    const zxReallocFunction old = zx_realloc;
    asked_for = 0;
    zx_realloc = note_and_fail;
    const kit::Failure failure = kit::failure_of([&] { table.grow(slots); });
    zx_realloc = old;
    ASSERT_TRUE(failure.failed);
    if (n >= 0xFFFFFFFF / k_entry) {
      ASSERT_EQ(failure.message, "2201: zxaa: tbl too big");
      ASSERT_EQ(asked_for, 0U);
      ++refused;
    } else {
      ASSERT_EQ(failure.message, "2000: malloc: out of mem");
      ASSERT_GE(asked_for, std::min<std::uint64_t>(least, SIZE_MAX));
      ASSERT_LE(asked_for, most);
      ++granted;
    }
    ASSERT_EQ(shape_of(table), "0 0 0");
  }
  EXPECT_GT(granted, 100);
  EXPECT_GT(refused, 10);
}

TEST(zxaa, a_block_that_is_asked_for_holds_all_its_slots) {
  expect_blocks_of_their_size<std::int32_t>();
  expect_blocks_of_their_size<Value12>();
  expect_blocks_of_their_size<Value56>();
}

// --------------------------------------------------------------- removing --

TEST(zxaa, erase_removes_and_absent_keys_are_message_2204) {
  constexpr auto k_message = "2204: zxaa: no such element to erase";
  constexpr auto k_line = "[2204-2204-0/E-0/E//]";
  Plain table;
  EXPECT_FAILURE(table.erase(key(1)), k_message, k_line);  // no block yet
  table.set(key(1), 10);
  table.set(key(2), 20);
  table.erase(key(1));
  EXPECT_EQ(table.length(), 1);
  EXPECT_FALSE(table.contains(key(1)));
  EXPECT_EQ(table.get(key(2)), 20);
  EXPECT_FAILURE(table.erase(key(1)), k_message, k_line);
  EXPECT_FAILURE(table.erase(key(65)), k_message, k_line);
  table.erase(key(2));
  EXPECT_EQ(shape_of(table), "64 0 63");
  table.set(key(2), 21);
  EXPECT_EQ(table.get(key(2)), 21);
}

// All runs of five entries with homes at the block's end and start, each of
// the five removed in turn: what moves is what the rule moves.
TEST(zxaa, erase_closes_runs_that_wrap_as_the_rule_says) {
  constexpr int k_entries = 5;
  constexpr int k_homes[] = {61, 62, 63, 64, 65};  // the last two: 0 and 1
  for (int code = 0; code < 3125; ++code) {
    std::vector<std::int32_t> keys;
    int rest = code;
    for (int i = 0; i < k_entries; ++i, rest /= 5)
      keys.push_back(k_homes[rest % 5] + 64 * 100 * (i + 1));
    for (const std::int32_t removed : keys) {
      Plain table;
      Model model(hash_of_number);
      for (const std::int32_t k : keys) {
        table.set(key(k), k);
        model.set(name_of(k), k);
      }
      table.erase(key(removed));
      model.erase(name_of(removed));
      expect_same(table, model);
      for (const std::int32_t k : keys)
        ASSERT_EQ(table.contains(key(k)), k != removed);
      if (HasFatalFailure()) return;
    }
  }
}

TEST(zxaa, a_run_that_wraps_survives_the_removal_of_each_in_turn) {
  Plain table;
  std::vector<std::int32_t> keys;
  for (int i = 0; i < 20; ++i) keys.push_back(55 + 64 * i);
  for (const std::int32_t k : keys) table.set(key(k), k);
  while (!keys.empty()) {
    table.erase(key(keys.front()));
    keys.erase(keys.begin());
    for (const std::int32_t k : keys) ASSERT_EQ(table.get(key(k)), k);
    ASSERT_EQ(table.length(), static_cast<int>(keys.size()));
  }
}

// -------------------------------------------------------------- ownership --

TEST(zxaa, values_are_made_and_destroyed_once) {
  zxAA<PlainKey, Counted> table;
  EXPECT_EQ(table.get(key(1)).number, 77);  // the shared empty value
  const int others = Counted::alive;
  EXPECT_EQ(table.ref(key(1)).number, 77);
  for (int i = 1; i <= 500; ++i) table.set(key(i * 64), Counted(i));
  EXPECT_EQ(Counted::alive - others, 501);
  table.set(key(64), Counted(5));  // overwritten
  EXPECT_EQ(Counted::alive - others, 501);
  for (int i = 1; i <= 400; ++i) table.erase(key(i * 64));
  EXPECT_EQ(Counted::alive - others, 101);
  EXPECT_EQ(table.get(key(401 * 64)).number, 401);
  table.clear();
  EXPECT_EQ(Counted::alive - others, 0);
  EXPECT_EQ(shape_of(table), "0 0 0");
  {
    zxAA<PlainKey, Counted> short_lived;
    short_lived.set(key(3), Counted(3));
    EXPECT_EQ(Counted::alive - others, 1);
  }
  EXPECT_EQ(Counted::alive - others, 0);
}

TEST(zxaa, keys_and_values_are_shared_strings) {
  const zxStr name("a key of some length");
  const zxStr text("a value of some length");
  {
    zxSA<zxStr> table;
    table.set(name, text);
    table.ref(name) = text;
    EXPECT_EQ(name.representation()->refs, 2);
    EXPECT_EQ(text.representation()->refs, 2);
    for (int i = 0; i < 300; ++i)
      table.set(zxStr(std::to_string(i).c_str()), text);
    table.erase(name);
    EXPECT_EQ(name.representation()->refs, 1);
  }
  EXPECT_EQ(text.representation()->refs, 1);
}

TEST(zxaa, a_value_of_the_table_may_be_stored_again) {
  zxSA<zxStr> table;
  table.set("0", "the text of all");
  for (int i = 1; i < 300; ++i) {
    const zxStr next(std::to_string(i));
    table.set(next, table.get(std::to_string(i - 1).c_str()));
  }
  EXPECT_TRUE(table.get("299") == "the text of all");
  EXPECT_EQ(table.get("0").representation()->refs, 300);
}

TEST(zxaa, ref_takes_a_key_of_the_table_that_moves_as_it_grows) {
  Strings table;
  int growths = 0;
  for (int i = 0; i < 3000; ++i) {
    table.ref(zxStr("a key with a number " + std::to_string(i))) = i;
    // What grows now is a table that has the key.
    const bool grows = table.length() + table.length() / 4 >= table.slots();
    const std::int32_t slots = table.slots();
    const auto first = table.begin();
    const std::int32_t number = (*first).value;
    ASSERT_EQ(table.ref((*first).key), number);
    ASSERT_EQ(table.slots() > slots, grows);
    growths += grows;
  }
  // At 52, 103, 205, 410, 820, 1639 and 2458 entries.
  EXPECT_EQ(growths, 7);
  EXPECT_EQ(table.slots(), 4096);
  EXPECT_EQ(table.length(), 3000);
}

TEST(zxaa, set_takes_a_key_and_a_value_of_the_table_that_move_as_it_grows) {
  zxSA<zxStr> table;
  table.set("key 0", "key 1");
  for (int i = 1; i < 3000; ++i) {
    const zxStr name(std::to_string(i - 1));
    const zxStr next(std::to_string(i));
    // The value names the new key, and is its value too.
    table.ref("key 0") = next;
    table.set(table.get("key 0"), table.get("key 0"));
    ASSERT_EQ(table.length(), i + 1);
    ASSERT_TRUE(table.get(next) == next);
    ASSERT_TRUE(i == 1 || table.get(name) == name);
  }
  EXPECT_EQ(table.slots(), 4096);
}

TEST(zxaa, ref_takes_a_value_of_the_table_as_a_new_key) {
  zxSA<zxStr> table;
  table.set("key 0", "0");
  for (int i = 0; i < 3000; ++i) {
    const zxStr& value = *table.find("key 0");
    table.ref(value) = "x";  // grows ahead of the insertion
    table.set("key 0", zxStr(std::to_string(i + 1)));
    ASSERT_EQ(table.length(), i + 2);
    ASSERT_TRUE(table.get(zxStr(std::to_string(i))) == "x");
  }
}

TEST(zxaa, erase_takes_a_key_or_a_value_of_the_table) {
  zxSA<zxStr> table;
  for (int i = 0; i < 1000; ++i)
    table.set(zxStr(std::to_string(i)), zxStr(std::to_string(999 - i)));
  for (int left = 1000; left > 0; left -= 2) {
    // Each names the other.
    const zxStr& key = (*table.begin()).key;
    const zxStr kept_key = key;
    const zxStr& value = (*table.begin()).value;
    const zxStr kept_value = value;
    if (left % 4 == 0) {
      table.erase(key);
      table.erase(kept_value);
    } else {
      table.erase(value);
      table.erase(kept_key);
    }
    ASSERT_EQ(table.length(), left - 2);
    ASSERT_FALSE(table.contains(kept_key) || table.contains(kept_value));
  }
  EXPECT_EQ(table.begin(), table.end());
}

// ------------------------------------------------------------ string keys --

TEST(zxaa, string_keys_are_found_by_text_and_by_string) {
  Strings table;
  table.set("one", 1);
  table.ref("two") = 2;
  const zxStr one("one");
  EXPECT_EQ(*table.find("one"), 1);
  EXPECT_EQ(*table.find(one), 1);
  EXPECT_EQ(*std::as_const(table).find("one"), 1);
  EXPECT_EQ(*std::as_const(table).find(one), 1);
  EXPECT_EQ(table.get("two"), 2);
  EXPECT_EQ(table.get(zxStr("two")), 2);
  EXPECT_TRUE(table.contains("two"));
  EXPECT_TRUE(table.contains(one));
  EXPECT_EQ(table.at("one"), 1);
  EXPECT_EQ(table.at(one), 1);
  table.at("one") = 11;
  EXPECT_EQ(table.at(one), 11);
  EXPECT_EQ(table.find("three"), nullptr);
  EXPECT_EQ(table.find("on"), nullptr);
  EXPECT_EQ(table.find("ones"), nullptr);
  EXPECT_EQ(table.find("One"), nullptr);
  EXPECT_EQ(table.get("three"), 0);
  EXPECT_EQ(table.length(), 2);
  table.erase("one");
  EXPECT_EQ(table.find("one"), nullptr);
}

TEST(zxaa, the_home_of_a_string_is_its_checksum) {
  Strings table;
  table.set("123456789", 1);  // 0x29B1
  const Slots slots = slots_of(table);
  ASSERT_EQ(slots.size(), 64U);
  EXPECT_EQ(slots[0x29B1 % 64], Slot(std::pair("123456789"s, 1)));
}

TEST(zxaa, the_empty_string_is_an_ordinary_key) {
  Strings table;
  EXPECT_EQ(table.find(""), nullptr);
  table.set(zxStr(), 5);
  EXPECT_EQ(*table.find(""), 5);
  EXPECT_EQ(*table.find(zxStr()), 5);
  EXPECT_EQ(*table.find(zxStr("x", 0)), 5);
  EXPECT_EQ(table.at(""), 5);
  EXPECT_EQ(table.length(), 1);
  table.erase("");
  EXPECT_EQ(table.length(), 0);
  EXPECT_FALSE(table.contains(""));
}

TEST(zxaa, keys_compare_by_length_and_bytes) {
  Strings table;
  const zxStr keys[] = {zxStr("a"), zxStr("a\0", 2), zxStr("a\0b", 3),
                        zxStr("a\0c", 3), zxStr('\0')};
  for (int i = 0; i < 5; ++i) table.set(keys[i], i + 1);
  EXPECT_EQ(table.length(), 5);
  for (int i = 0; i < 5; ++i) EXPECT_EQ(table.get(keys[i]), i + 1);
  EXPECT_EQ(*table.find("a\0b"), 1);  // text ends at its NUL
  EXPECT_EQ(table.find(""), nullptr);
}

TEST(zxaa, a_lookup_by_text_builds_no_string) {
  Strings table;
  table.set("a key of some length", 1);
  const zxReallocFunction old = zx_realloc;
  zx_realloc = no_memory;
  EXPECT_NE(table.find("a key of some length"), nullptr);
  EXPECT_EQ(table.find("another key of some length"), nullptr);
  EXPECT_EQ(table.get("a key of some length"), 1);
  EXPECT_EQ(table.at("a key of some length"), 1);
  EXPECT_FALSE(table.contains("another key of some length"));
  zx_realloc = old;
}

TEST(zxaa, at_of_an_absent_string_is_message_2203_with_the_key) {
  Strings table;
  const std::string line = "[2203-2203-0/E-0/E/";
  EXPECT_FAILURE(table.at("gone"), "2203: zxsa: no such element 'gone'",
                 line + "gone/]");
  table.set("here", 1);
  EXPECT_FAILURE(table.at("gone"), "2203: zxsa: no such element 'gone'",
                 line + "gone/]");
  EXPECT_FAILURE(table.at(zxStr("gone")), "2203: zxsa: no such element 'gone'",
                 line + "gone/]");
  EXPECT_FAILURE(table.at("100%s"), "2203: zxsa: no such element '100%s'",
                 line + "100%s/]");
  const std::string name(200, 'k');
  EXPECT_FAILURE(table.at(name.c_str()),
                 "2203: zxsa: no such element '" + name.substr(60) + "'",
                 line + "kkkkkkkkkkkk/]");
  EXPECT_EQ(table.length(), 1);
}

// Groups of texts with one checksum, three of each.
std::vector<std::vector<std::string>> colliding_texts() {
  std::map<std::uint16_t, std::vector<std::string>> by_checksum;
  std::vector<std::vector<std::string>> groups;
  for (int i = 0; groups.size() < 40 && i < 1'000'000; ++i) {
    const std::string text = "k" + std::to_string(i);
    std::vector<std::string>& group =
        by_checksum[crc16(text.data(), text.size())];
    group.push_back(text);
    if (group.size() == 3) groups.push_back(group);
  }
  return groups;
}

TEST(zxaa, keys_of_one_checksum_pass_each_other) {
  const auto groups = colliding_texts();
  ASSERT_EQ(groups.size(), 40U);
  for (const auto& group : groups) {
    for (std::size_t removed = 0; removed < 3; ++removed) {
      Strings table;
      for (std::size_t i = 0; i < 3; ++i)
        table.set(group[i].c_str(), static_cast<int>(i));
      EXPECT_EQ(table.length(), 3);
      table.erase(group[removed].c_str());
      for (std::size_t i = 0; i < 3; ++i) {
        const std::int32_t* value = table.find(group[i].c_str());
        ASSERT_EQ(value != nullptr, i != removed);
        ASSERT_TRUE(i == removed || *value == static_cast<int>(i));
      }
    }
  }
}

// ----------------------------------------------- null keys, broken tables --

struct Operation {
  const char* name;
  void (*call)(Plain&, PlainKey);
};

const Operation k_key_operations[] = {
    {"find", [](Plain& t, PlainKey k) { t.find(k); }},
    {"const find", [](Plain& t, PlainKey k) { std::as_const(t).find(k); }},
    {"contains", [](Plain& t, PlainKey k) { t.contains(k); }},
    {"lookup",
     [](Plain& t, PlainKey k) {
       std::int32_t* v;
       t.lookup(k, v);
     }},
    {"get", [](Plain& t, PlainKey k) { t.get(k); }},
    {"ref", [](Plain& t, PlainKey k) { t.ref(k); }},
    {"set", [](Plain& t, PlainKey k) { t.set(k, 1); }},
    {"erase", [](Plain& t, PlainKey k) { t.erase(k); }},
};

TEST(zxaa, the_null_key_is_an_assertion_in_every_operation) {
  for (const int entries : {0, 5}) {
    for (const Operation& operation : k_key_operations) {
      SCOPED_TRACE(operation.name);
      Plain table;
      fill(table, entries);
      const std::string shape = shape_of(table);
      EXPECT_ASSERTION(operation.call(table, key(0)), "zxaa");
      kit::with_failures_dropped([&] { operation.call(table, key(0)); });
      EXPECT_EQ(shape_of(table), shape);
    }
  }
}

TEST(zxaa, a_string_without_a_representation_is_a_null_key) {
  alignas(zxStr) unsigned char zeros[sizeof(zxStr)] = {};
  const zxStr& null = *reinterpret_cast<const zxStr*>(zeros);
  Strings table;
  EXPECT_ASSERTION(table.find(null), "zxaa");
  table.set("a", 1);
  EXPECT_ASSERTION(table.find(null), "zxaa");
  EXPECT_ASSERTION(table.ref(null), "zxaa");
  EXPECT_ASSERTION(table.set(null, 1), "zxaa");
  EXPECT_ASSERTION(table.erase(null), "zxaa");
  EXPECT_EQ(table.length(), 1);
}

const struct {
  const char* name;
  void (*corrupt)(Fields&);
} k_corruptions[] = {
    {"negative count", [](Fields& f) { f.count = -1; }},
    {"count above capacity", [](Fields& f) { f.count = 65; }},
    {"count without capacity", [](Fields& f) { f.capacity = 0; }},
    {"no table", [](Fields& f) { f.table = nullptr; }},
    {"another mask", [](Fields& f) { f.mask = 31; }},
    {"mask far above", [](Fields& f) { f.mask = 0xFFFFFFFF; }},
    {"negative capacity", [](Fields& f) { f.capacity = -64; }},
};

TEST(zxaa, every_operation_finds_a_corrupt_table) {
  for (const auto& corruption : k_corruptions) {
    for (const Operation& operation : k_key_operations) {
      SCOPED_TRACE(std::string(corruption.name) + ", " + operation.name);
      Plain table;
      fill(table, 5);
      const Fields good = fields_of(table);
      Fields bad = good;
      corruption.corrupt(bad);
      set_fields(table, bad);
      EXPECT_ASSERTION(operation.call(table, key(3)), "zxaa");
      kit::with_failures_dropped([&] { operation.call(table, key(3)); });
      EXPECT_EQ(fields_of(table).count, bad.count);
      EXPECT_EQ(fields_of(table).capacity, bad.capacity);
      set_fields(table, good);
      EXPECT_EQ(table.get(key(3)), 3);
    }
  }
}

TEST(zxaa, a_lookup_by_text_does_not_check_the_table) {
  Strings table;
  table.set("a", 1);
  const Fields good = fields_of(table);
  Fields bad = good;
  bad.count = -1;
  set_fields(table, bad);
  EXPECT_NE(table.find("a"), nullptr);
  EXPECT_ASSERTION(table.find(zxStr("a")), "zxaa");
  set_fields(table, good);
}

// A table without a free slot, as growth prevents it.
class FullTable {
 public:
  FullTable() {
    fill(table, 51);
    Fields fields = fields_of(table);
    fields.capacity = 51;
    fields.mask = 0;
    set_fields(table, fields);
  }

  Plain table;
};

TEST(zxaa, a_walk_that_wraps_twice_is_message_2206_without_a_text) {
  constexpr auto k_line = "[2206-2206-0/E-0/E//]";
  FullTable full;
  for (const std::int32_t k : {-1, 63, 64, 5000}) {
    EXPECT_FAILURE(full.table.find(key(k)), "2206: ", k_line);
    EXPECT_FAILURE(full.table.get(key(k)), "2206: ", k_line);
    EXPECT_FAILURE(full.table.set(key(k), 1), "2206: ", k_line);
    EXPECT_FAILURE(full.table.erase(key(k)), "2206: ", k_line);
  }
  EXPECT_EQ(shape_of(full.table), "51 51 0");
}

TEST(zxaa, a_dropped_2206_leaves_the_walk) {
  FullTable full;
  kit::with_failures_dropped([&] {
    EXPECT_EQ(full.table.find(key(500)), nullptr);
    EXPECT_EQ(full.table.get(key(500)), 0);
    full.table.set(key(500), 1);
    full.table.erase(key(500));
  });
  EXPECT_EQ(shape_of(full.table), "51 51 0");
}

// A table with an entry in each of its 64 slots, which growth prevents: while
// it is filled its fields tell of more slots.
class BrimfulTable {
 public:
  BrimfulTable() {
    const auto put = [this](std::int32_t k) {
      table.set(key(k), k);
      model.count = 0;  // so that it does not grow
      model.set(std::to_string(k), k);
    };
    for (std::int32_t k = 1; k <= 51; ++k) put(k);
    EXPECT_NE(table.begin(), table.end());  // the order of 64 slots is made
    tell_of_slots(200);
    for (std::int32_t k = 1052; k <= 1064; ++k) put(k);
    tell_of_slots(64);
    model.count = 64;
  }
  void tell_of_slots(std::int32_t slots) {
    Fields fields = fields_of(table);
    fields.capacity = slots;
    fields.mask = slots == 64 ? 63 : 0;
    set_fields(table, fields);
  }

  Plain table;
  Model model{hash_of_number};
};

TEST(zxaa, a_full_table_has_its_keys_and_2206_for_all_others) {
  constexpr auto k_line = "[2206-2206-0/E-0/E//]";
  BrimfulTable full;
  Plain& table = full.table;
  expect_same(table, full.model);
  for (const std::int32_t k : {52, 1051, 5000, -1}) {
    SCOPED_TRACE(k);
    std::int32_t* value;
    EXPECT_FAILURE(table.find(key(k)), "2206: ", k_line);
    EXPECT_FAILURE(table.get(key(k)), "2206: ", k_line);
    EXPECT_FAILURE(table.at(key(k)), "2206: ", k_line);
    EXPECT_FAILURE(table.contains(key(k)), "2206: ", k_line);
    EXPECT_FAILURE(table.lookup(key(k), value), "2206: ", k_line);
    EXPECT_FAILURE(table.set(key(k), 1), "2206: ", k_line);
    EXPECT_FAILURE(table.erase(key(k)), "2206: ", k_line);
    kit::with_failures_dropped([&] {
      EXPECT_EQ(table.find(key(k)), nullptr);
      table.set(key(k), 1);
      table.erase(key(k));
    });
    expect_same(table, full.model);
  }
  for (const auto [k, value] : table) ASSERT_EQ(table.get(k), value);
  table.set(key(7), 70);
  full.model.set("7", 70);
  expect_same(table, full.model);
  table.erase(key(7));
  full.model.erase("7");
  expect_same(table, full.model);
}

TEST(zxaa, ref_finds_room_in_a_full_table_for_it_grows_first) {
  BrimfulTable full;
  full.table.ref(key(5000)) = 5;
  full.model.ref("5000", 5);
  EXPECT_EQ(shape_of(full.table), "128 65 127");
  expect_same(full.table, full.model);
}

TEST(zxaa, a_key_for_which_no_slot_is_left_is_message_2206) {
  constexpr auto k_line = "[2206-2206-0/E-0/E//]";
  BrimfulTable full;
  full.tell_of_slots(200);
  EXPECT_FAILURE(full.table.ref(key(5000)), "2206: ", k_line);
  EXPECT_FAILURE(full.table.set(key(5000), 1), "2206: ", k_line);
  kit::with_failures_dropped([&] {
    full.table.ref(key(5000)) = 1;
    full.table.set(key(5000), 1);
    EXPECT_EQ(full.table.find(key(5000)), nullptr);
  });
  EXPECT_EQ(shape_of(full.table), "200 64 0");
  for (const std::int32_t k : {1, 51, 1052, 1064})
    EXPECT_EQ(full.table.get(key(k)), k);
}

TEST(zxaa, a_key_for_which_no_slot_is_left_changes_no_slot) {
  BrimfulTable full;
  full.tell_of_slots(200);
  kit::with_failures_dropped([&] {
    full.table.ref(key(5000)) = 1;
    full.table.set(key(5000), 1);
  });
  full.tell_of_slots(64);
  expect_same(full.table, full.model);
}

TEST(zxaa, a_dropped_failure_gives_a_neutral_value_and_changes_nothing) {
  zxSA<zxStr> table;
  table.set("a", "1");
  kit::with_failures_dropped([&] {
    EXPECT_TRUE(table.at("gone").is_empty());
    table.at("gone") = "lost";
    EXPECT_TRUE(table.at("gone").is_empty());
    EXPECT_TRUE(table.at(zxStr("gone")).is_empty());
    table.erase("gone");
  });
  EXPECT_EQ(shape_of(table), "64 1 63");
  EXPECT_TRUE(table.get("a") == "1");
  EXPECT_TRUE(table.get("gone").is_empty());

  Plain plain;
  kit::with_failures_dropped([&] {
    plain.ref(key(0)) = 5;
    EXPECT_EQ(plain.ref(key(0)), 0);
    EXPECT_EQ(plain.get(key(0)), 0);
    EXPECT_FALSE(plain.contains(key(0)));
  });
  EXPECT_EQ(shape_of(plain), "0 0 0");
}

// -------------------------------------------------- the parts of a table --

using zxaa_impl::Cell;
using zxaa_impl::Index;
using zxaa_impl::SlotMap;

// Bytes at the end of a block of exactly their size, so that a look behind
// them is noticed.
class ExactBytes {
 public:
  ExactBytes(std::string_view bytes, std::size_t place)
      : block(new char[place + bytes.size()]),
        start(block.get() + place),
        size(bytes.size()) {
    std::copy(bytes.begin(), bytes.end(), start);
  }
  std::uint32_t hash() const { return zxaa_impl::hash_of_bytes(start, size); }
  bool same_as(const ExactBytes& other) const {
    return zxaa_impl::same_bytes(start, other.start, size);
  }
  char& operator[](std::size_t i) { return start[i]; }

 private:
  std::unique_ptr<char[]> block;
  char* start;
  std::size_t size;
};

TEST(zxaa, the_hash_of_bytes_depends_on_each_bit_and_not_on_the_place) {
  constexpr unsigned k_seed = 64;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (std::size_t length = 0; length <= 64; ++length) {
    for (const bool zeros : {false, true}) {
      SCOPED_TRACE(length);
      std::string text(length, '\0');
      if (!zeros)
        for (char& byte : text) byte = static_cast<char>(random());
      const std::uint32_t expected = ExactBytes(text, 0).hash();
      for (std::size_t place = 1; place < 16; ++place)
        ASSERT_EQ(ExactBytes(text, place).hash(), expected);
      ExactBytes flipped(text, 3);
      for (std::size_t bit = 0; bit < 8 * length; ++bit) {
        const auto flip = static_cast<char>(1 << bit % 8);
        flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ flip);
        ASSERT_NE(flipped.hash(), expected) << bit;
        flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ flip);
      }
      ASSERT_EQ(flipped.hash(), expected);
    }
  }
}

TEST(zxaa, the_same_bytes_are_the_same_in_each_bit) {
  constexpr unsigned k_seed = 65;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (std::size_t length = 0; length <= 64; ++length) {
    SCOPED_TRACE(length);
    std::string text(length, '\0');
    for (char& byte : text) byte = static_cast<char>(random());
    const ExactBytes one(text, 0);
    for (std::size_t place = 0; place < 16; ++place)
      ASSERT_TRUE(one.same_as(ExactBytes(text, place)));
    ExactBytes flipped(text, 5);
    for (std::size_t bit = 0; bit < 8 * length; ++bit) {
      const auto flip = static_cast<char>(1 << bit % 8);
      flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ flip);
      ASSERT_FALSE(one.same_as(flipped)) << bit;
      ASSERT_FALSE(flipped.same_as(one)) << bit;
      flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ flip);
    }
  }
}

// A map of slots and the same in one flag for each slot.
class MapPair {
 public:
  explicit MapPair(std::int32_t slots)
      : words(SlotMap::word_count(slots)),
        map(words.data(), slots),
        model(zx_size(slots)) {}

  std::int32_t size() const { return static_cast<std::int32_t>(model.size()); }
  void take(std::int32_t slot) {
    map.take(slot);
    model[zx_size(slot)] = true;
  }
  void free(std::int32_t slot) {
    map.free(slot);
    model[zx_size(slot)] = false;
  }
  void take_all() {
    for (std::int32_t i = 0; i < size(); ++i) take(i);
  }
  void expect_same_from(std::int32_t home) const {
    ASSERT_EQ(map.first_free(home), slow_first_free(home)) << home;
  }
  // From every slot, or from some where there are very many.
  void expect_same() const {
    for (std::int32_t i = 0; i < size(); ++i) {
      const bool at_an_end = i < 100 || i + 100 >= size();
      if (size() > 10'000 && !at_an_end && i % 6'000 != 0) continue;
      expect_same_from(i);
      if (testing::Test::HasFatalFailure()) return;
    }
  }

 private:
  std::int32_t slow_first_free(std::int32_t home) const {
    const auto start = model.begin() + home;
    auto found = std::find(start, model.end(), false);
    if (found == model.end()) found = std::find(model.begin(), start, false);
    // At the start of the search there was no free one, if it ends there.
    if (found == start && *found) return -1;
    return static_cast<std::int32_t>(found - model.begin());
  }

  std::vector<std::uint64_t> words;
  SlotMap map;
  std::vector<bool> model;
};

constexpr std::int32_t k_map_sizes[] = {1,   63,   64,   65,   127,    128,
                                        129, 4095, 4096, 4097, 300'000};

TEST(zxaa, a_map_of_slots_finds_the_first_free_one_with_wrap) {
  constexpr unsigned k_seed = 4097;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (const std::int32_t size : k_map_sizes) {
    SCOPED_TRACE(size);
    MapPair pair(size);
    pair.expect_same();
    const auto any = [&] {
      return static_cast<std::int32_t>(random() % static_cast<unsigned>(size));
    };
    // Phases that fill the map up and thin it out.
    const int steps = size > 10'000 ? 60 : 1500;
    for (int i = 0; i < steps && !HasFatalFailure(); ++i) {
      const bool filling = i / 100 % 3 != 2;
      for (std::int32_t k = 0; k <= size / 40; ++k) {
        if (filling)
          pair.take(any());
        else if (k % 10 == 0)
          pair.free(any());
      }
      for (int k = 0; k < 5; ++k) pair.expect_same_from(any());
    }
    pair.expect_same();
    if (HasFatalFailure()) return;
  }
}

TEST(zxaa, a_full_map_has_no_free_slot_and_one_given_back_is_found) {
  for (const std::int32_t size : k_map_sizes) {
    SCOPED_TRACE(size);
    MapPair pair(size);
    pair.take_all();
    pair.expect_same();
    for (const std::int32_t slot : {0, size / 3, size / 2, size - 1}) {
      pair.free(slot);
      pair.expect_same_from(0);
      pair.expect_same_from(slot);
      pair.expect_same_from(slot + 1 == size ? 0 : slot + 1);
      pair.expect_same_from(size - 1);
      if (HasFatalFailure()) return;
      pair.take(slot);
      pair.expect_same_from(slot);
    }
    // All of a word, and all but one of the map.
    for (std::int32_t i = 0; i < std::min(size, 64); ++i) pair.free(i);
    pair.expect_same();
    if (HasFatalFailure()) return;
  }
}

// Of few free slots in long full runs the next one is found, and not one that
// lies behind the wrap.
TEST(zxaa, a_map_finds_the_next_of_few_free_slots) {
  constexpr unsigned k_seed = 6400;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (const std::int32_t size : {4097, 8193, 20'000, 300'000}) {
    SCOPED_TRACE(size);
    MapPair pair(size);
    pair.take_all();
    // Mostly around the ends of the words of the map, and of its summary.
    const auto any = [&] {
      const std::size_t unit = random() % 2 == 0 ? 64 : 64 * 64;
      const std::size_t slot = random() % zx_size(size) / unit * unit;
      return static_cast<std::int32_t>((slot + random() % 3) % zx_size(size));
    };
    for (int round = 0; round < 50; ++round) {
      const std::int32_t slots[] = {any(), any(), any()};
      for (const std::int32_t slot : slots) pair.free(slot);
      for (const std::int32_t slot : slots) {
        pair.expect_same_from(slot);
        pair.expect_same_from(slot + 1 == size ? 0 : slot + 1);
        pair.expect_same_from(any());
      }
      if (HasFatalFailure()) return;
      for (const std::int32_t slot : slots) pair.take(slot);
    }
  }
}

// An index and what it should hold.
class IndexPair {
 public:
  explicit IndexPair(std::int32_t room_for)
      : room(room_for),
        cells(static_cast<std::size_t>(Index::cell_count(room_for))),
        index(cells.data(), room_for) {}

  void add(std::int32_t entry, std::uint32_t hash) {
    index.add(hash, entry);
    model[entry] = hash;
  }
  void remove(std::int32_t entry) {
    index.remove(find(entry, model.at(entry)));
    model.erase(entry);
  }
  void renumber(std::int32_t from, std::int32_t to) {
    index.renumber(model.at(from), from, to);
    model[to] = model.at(from);
    model.erase(from);
  }
  void take_over(const IndexPair& other) {
    index.take_over(other.index);
    model = other.model;
  }
  Cell* find(std::int32_t entry, std::uint32_t hash) const {
    return index.find(hash, [=](std::int32_t e) { return e == entry; });
  }

  void check() const {
    for (const auto& [entry, hash] : model) {
      const Cell* cell = find(entry, hash);
      ASSERT_NE(cell, nullptr);
      ASSERT_EQ(cell->entry_above, entry + 1);
      ASSERT_EQ(cell->hash, hash);
      // Where a walk ends that finds nothing there is room.
      const Cell* end = find(-5, hash);
      ASSERT_NE(end, nullptr);
      ASSERT_EQ(end->entry_above, 0);
    }
    ASSERT_EQ(
        std::ranges::count_if(
            cells, [](const Cell& cell) { return cell.entry_above != 0; }),
        static_cast<std::ptrdiff_t>(model.size()));
  }

  const std::int32_t room;
  std::unordered_map<std::int32_t, std::uint32_t> model;

 private:
  std::vector<Cell> cells;
  Index index;
};

TEST(zxaa, an_index_has_half_as_many_cells_again_up_to_a_power_of_two) {
  const struct {
    std::int32_t room;
    std::uint64_t cells;
  } rows[] = {{32, 64},     {33, 64},     {42, 64},     {43, 64},
              {44, 128},    {64, 128},    {1024, 2048}, {3072, 8192},
              {5461, 8192}, {5462, 16384}};
  for (const auto& row : rows)
    EXPECT_EQ(Index::cell_count(row.room), row.cells) << row.room;
  EXPECT_EQ(Index::cell_count(INT_MAX), 0x100000000U);
}

TEST(zxaa, an_index_holds_what_a_map_of_the_standard_holds) {
  constexpr unsigned k_seed = 32;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (const std::int32_t room : {32, 33, 64, 200}) {
    SCOPED_TRACE(room);
    IndexPair pair(room);
    const auto last = static_cast<std::uint32_t>(Index::cell_count(room) - 1);
    // Homes at the end and the start of the cells, shared by other hashes.
    const std::uint32_t hashes[] = {0,        1,          last,
                                    last - 1, last + 1,   2 * last + 1,
                                    last - 2, 0xFFFFFFFF, 0x80000000 + last};
    const auto any_hash = [&]() -> std::uint32_t {
      if (random() % 3 == 0) return static_cast<std::uint32_t>(random());
      return hashes[random() % std::size(hashes)];
    };
    const auto any_entry = [&] {
      return static_cast<std::int32_t>(random() % static_cast<unsigned>(room));
    };
    for (int step = 0; step < 5000 && !HasFatalFailure(); ++step) {
      const std::int32_t entry = any_entry();
      const std::int32_t other = any_entry();
      const bool is_there = pair.model.contains(entry);
      const bool shrinking = step / 300 % 3 == 2;
      if (!is_there) {
        const bool has_room = pair.model.size() < zx_size(room) * 4 / 5;
        if (has_room && (!shrinking || random() % 3 == 0))
          pair.add(entry, any_hash());
      } else if (shrinking || random() % 3 == 0) {
        pair.remove(entry);
      } else if (!pair.model.contains(other)) {
        pair.renumber(entry, other);
      }
      pair.check();
    }
    for (const std::int32_t larger : {room, 2 * room, 1000}) {
      IndexPair next(larger);
      next.take_over(pair);
      next.check();
    }
  }
}

// A run of ten from the last but two cells on, each of them removed in turn.
TEST(zxaa, a_removal_inside_a_run_that_wraps_keeps_the_others) {
  constexpr std::int32_t k_room = 32;
  const auto last = static_cast<std::uint32_t>(Index::cell_count(k_room) - 1);
  for (std::int32_t removed = 0; removed < 10; ++removed) {
    for (const std::uint32_t spread : {0U, 1U, 2U}) {
      SCOPED_TRACE(std::to_string(removed) + " " + std::to_string(spread));
      IndexPair pair(k_room);
      for (std::int32_t i = 0; i < 10; ++i)
        pair.add(i, last - 2 + static_cast<std::uint32_t>(i) % 3 * spread);
      pair.remove(removed);
      pair.check();
    }
  }
}

TEST(zxaa, a_full_index_ends_its_walks) {
  IndexPair pair(32);
  for (std::int32_t i = 0; i < 64; ++i)
    pair.add(i, static_cast<std::uint32_t>(i) % 7);
  for (std::int32_t i = 0; i < 64; ++i) {
    const Cell* cell = pair.find(i, static_cast<std::uint32_t>(i) % 7);
    ASSERT_NE(cell, nullptr);
    ASSERT_EQ(cell->entry_above, i + 1);
  }
  EXPECT_EQ(pair.find(64, 5), nullptr);
  EXPECT_EQ(pair.find(0, 5), nullptr);
  pair.add(64, 5);  // without a place
  EXPECT_EQ(pair.find(64, 5), nullptr);
  EXPECT_NE(pair.find(63, 0), nullptr);
}

// --------------------------------------------- random use against a model --

// What a test of one kind of table needs to know about its keys.
struct PlainKind {
  using Table = Plain;
  static std::uint32_t hash(const std::string& k) { return hash_of_number(k); }
  static PlainKey key_of(const std::string& k) {
    return key(static_cast<std::int32_t>(std::stol(k)));
  }
  // Crowded homes, never the null key.
  static std::string any_key(std::mt19937& random, unsigned keys) {
    return std::to_string(1 + random() % keys + random() % 3 * 4096 * 5);
  }
};

struct StringKind {
  using Table = Strings;
  static std::uint32_t hash(const std::string& k) { return hash_of_text(k); }
  static zxStr key_of(const std::string& k) {
    return zxStr(k.data(), zx_count(k.size()));
  }
  static std::string any_key(std::mt19937& random, unsigned keys) {
    const std::string text = std::to_string(random() % keys);
    return random() % 50 == 0 ? "" : text + "\0x"s.substr(0, random() % 3);
  }
};

template <class Kind>
class Pair {
 public:
  Pair(unsigned seed, unsigned key_count) : random(seed), keys(key_count) {}

  // Phases of mostly storing and of mostly removing follow each other.
  void step(int number) {
    const std::string k = Kind::any_key(random, keys);
    const auto real_key = Kind::key_of(k);
    const auto value = static_cast<std::int32_t>(random());
    const bool shrinking = number / 1000 % 3 == 2;
    switch (random() % (shrinking ? 16 : 8)) {
      case 0:
      case 1:
      case 2:
        real.set(real_key, value);
        model.set(k, value);
        plain[k] = value;
        break;
      case 3:
      case 4:
        real.ref(real_key) = value;
        model.ref(k, value);
        plain[k] = value;
        break;
      case 5:
        look(k);
        break;
      case 6:
        clear_rarely();
        break;
      default:
        erase(k);
    }
  }

  void check(bool slot_by_slot) {
    ASSERT_EQ(real.length(), static_cast<int>(plain.size()));
    if (!slot_by_slot) return;
    expect_same(real, model);
    for (const auto& [k, value] : plain)
      ASSERT_EQ(real.get(Kind::key_of(k)), value);
  }

 private:
  void look(const std::string& k) {
    const std::int32_t* found = real.find(Kind::key_of(k));
    const auto expected = plain.find(k);
    ASSERT_EQ(found != nullptr, expected != plain.end());
    if (found == nullptr) return;
    ASSERT_EQ(*found, expected->second);
  }
  void erase(const std::string& k) {
    if (plain.erase(k) == 0) return;
    real.erase(Kind::key_of(k));
    model.erase(k);
  }
  void clear_rarely() {
    if (random() % 2000 != 0) return;
    real.clear();
    model = Model(Kind::hash);
    plain.clear();
  }

  std::mt19937 random;
  unsigned keys;
  typename Kind::Table real;
  Model model{Kind::hash};
  std::unordered_map<std::string, std::int32_t> plain;
};

template <class Kind>
void run_pair(unsigned seed, unsigned keys, int steps) {
  std::printf("seed %u, %u keys\n", seed, keys);
  Pair<Kind> pair(seed, keys);
  for (int i = 0; i < steps && !testing::Test::HasFatalFailure(); ++i) {
    SCOPED_TRACE("step " + std::to_string(i));
    pair.step(i);
    pair.check(i % 64 == 0 || i + 1 == steps);
  }
}

TEST(zxaa, random_use_of_plain_keys_gives_the_slots_of_the_model) {
  for (const unsigned seed : {1U, 2U, 3U}) {
    run_pair<PlainKind>(seed, 60, 10'000);
    run_pair<PlainKind>(seed, 6000, 10'000);
  }
}

TEST(zxaa, random_use_of_string_keys_gives_the_slots_of_the_model) {
  for (const unsigned seed : {1U, 2U, 3U}) {
    run_pair<StringKind>(seed, 40, 10'000);
    run_pair<StringKind>(seed, 4000, 10'000);
  }
}

TEST(zxaa_slow, long_random_use_gives_what_the_model_gives) {
  for (unsigned seed = 100; seed < 104; ++seed) {
    run_pair<PlainKind>(seed, 60, 100'000);
    run_pair<PlainKind>(seed, 20'000, 100'000);
    run_pair<StringKind>(seed, 40, 100'000);
    run_pair<StringKind>(seed, 20'000, 100'000);
  }
}

// ------------------------------------- the order of slots, asked for or not --

template <class Kind>
void put_random(typename Kind::Table& real, Model& model, std::mt19937& random,
                unsigned keys) {
  const std::string k = Kind::any_key(random, keys);
  const auto value = static_cast<std::int32_t>(random());
  if (random() % 2 == 0) {
    real.set(Kind::key_of(k), value);
    model.set(k, value);
  } else {
    real.ref(Kind::key_of(k)) = value;
    model.ref(k, value);
  }
}

template <class Kind>
void erase_random(typename Kind::Table& real, Model& model,
                  std::mt19937& random, unsigned keys) {
  const std::string k = Kind::any_key(random, keys);
  if (!real.contains(Kind::key_of(k))) return;
  real.erase(Kind::key_of(k));
  model.erase(k);
}

// However large the table is when the order is first asked for, it is that of
// a table in which it was known all the time.
template <class Kind>
void expect_order_whenever_asked(unsigned seed) {
  std::printf("seed %u\n", seed);
  for (const int steps : {1, 51, 53, 700, 2000, 6000}) {
    for (const int asked_at : {-1, 0, steps / 3, steps - 1}) {
      for (const bool asked_by_erase : {false, true}) {
        SCOPED_TRACE(std::to_string(steps) + " " + std::to_string(asked_at));
        std::mt19937 random(seed);
        typename Kind::Table real;
        Model model(Kind::hash);
        const auto keys = 2 * static_cast<unsigned>(steps);
        for (int i = 0; i < steps; ++i) {
          put_random<Kind>(real, model, random, keys);
          if (i != asked_at) continue;
          if (asked_by_erase)
            erase_random<Kind>(real, model, random, keys);
          else
            static_cast<void>(real.begin());
        }
        expect_same(real, model);
        for (int i = 0; i < 100; ++i) {
          erase_random<Kind>(real, model, random, keys);
          put_random<Kind>(real, model, random, keys);
        }
        expect_same(real, model);
        if (testing::Test::HasFatalFailure()) return;
      }
    }
  }
}

TEST(zxaa, the_order_is_the_same_whenever_it_is_asked_for) {
  expect_order_whenever_asked<PlainKind>(17);
  expect_order_whenever_asked<StringKind>(18);
}

TEST(zxaa_slow, the_order_is_the_same_whenever_it_is_asked_for) {
  for (unsigned seed = 200; seed < 215; ++seed) {
    expect_order_whenever_asked<PlainKind>(seed);
    expect_order_whenever_asked<StringKind>(seed);
  }
}

TEST(zxaa, a_cleared_table_knows_nothing_of_its_earlier_order) {
  for (const bool asked : {false, true}) {
    Plain table;
    fill(table, 700);
    if (asked) {
      EXPECT_NE(table.begin(), table.end());
    }
    table.clear();
    Model model(hash_of_number);
    for (const std::int32_t k : {62, 126, 190, 254, 64}) {
      table.set(key(k), k);
      model.set(std::to_string(k), k);
    }
    expect_same(table, model);
  }
}

// Growth by single slots, far more often than by the steps of a table.
TEST(zxaa, the_order_survives_any_number_of_growths) {
  for (const int asked_at : {-1, 60, 200}) {
    SCOPED_TRACE(asked_at);
    Plain table;
    Model model(hash_of_number);
    int growths = 0;
    for (int i = 1; i <= 400; ++i) {
      const std::int32_t k = i * 7919;
      table.ref(key(k)) = i;
      model.ref(std::to_string(k), i);
      const std::int32_t before = table.slots();
      for (int again = 0; again < 2; ++again) {  // one may not be enough
        table.grow(table.slots() + 1);
        model.grow(model.capacity() + 1);
      }
      growths += table.slots() != before;
      if (i == asked_at) expect_same(table, model);
    }
    EXPECT_GT(growths, 300);
    expect_same(table, model);
  }
}

// Texts with a checksum of one's choice: the last two bytes go into the whole
// of it, so for each checksum there is one pair of them.
class ChosenChecksum {
 public:
  ChosenChecksum() : last_bytes(0x10000) {
    for (unsigned i = 0; i < 0x10000; ++i)
      last_bytes[sum_behind("", i)] = static_cast<std::uint16_t>(i);
  }
  std::string text(const std::string& start, std::uint16_t checksum) const {
    // What goes in is mixed with the sum so far.
    const unsigned before = crc16(start.data(), start.size());
    const unsigned mixed = last_bytes[checksum] ^ before ^ 0xFFFFU;
    return start + static_cast<char>(mixed >> 8) + static_cast<char>(mixed);
  }

 private:
  static std::uint16_t sum_behind(const std::string& start, unsigned bytes) {
    const std::string all =
        start + static_cast<char>(bytes >> 8) + static_cast<char>(bytes & 0xFF);
    return crc16(all.data(), all.size());
  }
  std::vector<std::uint16_t> last_bytes;
};

// Many texts whose homes are the last and the first slots of a table: three
// for each of up to five checksums of a home.
std::vector<std::string> texts_around_the_end(std::int32_t size) {
  const ChosenChecksum chosen;
  std::vector<std::string> texts;
  for (const std::int32_t home : {size - 3, size - 2, size - 1, 0, 2}) {
    for (int k = 0; k < 5; ++k) {
      const std::int32_t checksum = home + k * size;
      for (int i = 0; i < 3 && checksum <= 0xFFFF; ++i)
        texts.push_back(chosen.text("k" + std::to_string(i) + "_",
                                    static_cast<std::uint16_t>(checksum)));
    }
  }
  return texts;
}

TEST(zxaa, runs_of_colliding_strings_that_wrap_are_kept_by_the_rule) {
  constexpr unsigned k_seed = 5120;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (const std::int32_t size : {64, 2048, 3072, 4096, 5120}) {
    SCOPED_TRACE(size);
    std::vector<std::string> texts = texts_around_the_end(size);
    if (size == 64) texts.resize(45);
    for (const std::string& text : texts) {
      const std::size_t home = hash_of_text(text) % zx_size(size);
      ASSERT_TRUE(home < 3 || home + 3 >= zx_size(size));
    }
    std::shuffle(texts.begin(), texts.end(), random);
    Strings table;
    Model model(hash_of_text);
    table.grow(size);
    model.grow(size);
    for (std::size_t i = 0; i < texts.size(); ++i) {
      table.set(zxStr(std::string_view(texts[i])), static_cast<int>(i));
      model.set(texts[i], static_cast<int>(i));
    }
    ASSERT_EQ(table.slots(), size);
    ASSERT_EQ(fields_of(table).mask == 0, size == 3072 || size == 5120);
    expect_same(table, model);
    for (std::size_t gone = 0; gone < texts.size(); ++gone) {
      table.erase(zxStr(std::string_view(texts[gone])));
      model.erase(texts[gone]);
      expect_same(table, model);
      for (std::size_t i = 0; i < texts.size(); ++i) {
        const auto* value = table.find(zxStr(std::string_view(texts[i])));
        ASSERT_EQ(value != nullptr, i > gone);
        ASSERT_TRUE(i <= gone || *value == static_cast<int>(i));
      }
      if (HasFatalFailure()) return;
    }
  }
}

// ------------------------------------------------------------- large tables --

// Far apart, so that they make short runs only.
std::int32_t spread_key(std::int32_t i) {
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(i) *
                                   2'654'435'761U);
}

TEST(zxaa, a_hundred_thousand_numbers_are_found_and_erased) {
  constexpr std::int32_t k_keys = 100'000;
  zxAA<std::int32_t, std::int32_t> table;
  for (std::int32_t i = 1; i <= k_keys; ++i) table.set(spread_key(i), i);
  EXPECT_EQ(table.length(), k_keys);
  // count + count/4 is below a capacity of so many steps, and not below one
  // step less.
  EXPECT_EQ(table.slots(), 123 * 1024);
  for (std::int32_t i = 1; i <= k_keys; ++i)
    ASSERT_EQ(table.get(spread_key(i)), i);
  for (std::int32_t i = k_keys + 1; i <= 2 * k_keys; ++i)
    ASSERT_EQ(table.find(spread_key(i)), nullptr);
  for (std::int32_t i = 3; i <= k_keys; i += 3) table.erase(spread_key(i));
  EXPECT_EQ(table.length(), k_keys - k_keys / 3);
  for (std::int32_t i = 1; i <= k_keys; ++i) {
    const std::int32_t* value = table.find(spread_key(i));
    ASSERT_EQ(value != nullptr, i % 3 != 0);
    ASSERT_TRUE(value == nullptr || *value == i);
  }
  std::vector<bool> seen(k_keys + 1);
  for (const auto [k, value] : table) {
    ASSERT_EQ(k, spread_key(value));
    ASSERT_FALSE(seen[zx_size(value)]);
    seen[zx_size(value)] = true;
  }
  EXPECT_EQ(std::ranges::count(seen, true), table.length());
  EXPECT_EQ(table.slots(), 123 * 1024);
}

// Of which many share a checksum, since there are 65 536 of those.
TEST(zxaa, a_hundred_thousand_strings_are_found_and_some_erased) {
  constexpr std::int32_t k_keys = 100'000;
  constexpr std::int32_t k_erased_each = 997;  // erasing is slow in large runs
  const auto name = [](std::int32_t i) { return "key " + std::to_string(i); };
  Strings table;
  for (std::int32_t i = 0; i < k_keys; ++i) table.set(zxStr(name(i)), i);
  EXPECT_EQ(table.length(), k_keys);
  EXPECT_EQ(table.slots(), 123 * 1024);
  for (std::int32_t i = 0; i < k_keys; ++i) {
    ASSERT_EQ(table.get(name(i).c_str()), i);
    ASSERT_FALSE(table.contains(name(k_keys + i).c_str()));
  }
  for (std::int32_t i = 0; i < k_keys; i += k_erased_each)
    table.erase(zxStr(name(i)));
  for (std::int32_t i = 0; i < k_keys; ++i) {
    const std::int32_t* value = table.find(zxStr(name(i)));
    ASSERT_EQ(value != nullptr, i % k_erased_each != 0);
    ASSERT_TRUE(value == nullptr || *value == i);
  }
  std::vector<bool> seen(k_keys);
  for (const auto [k, value] : table) {
    ASSERT_EQ(k.view(), name(value));
    ASSERT_FALSE(seen[zx_size(value)]);
    seen[zx_size(value)] = true;
  }
  EXPECT_EQ(std::ranges::count(seen, true), table.length());
}

}  // namespace
