// zxaa_test.cpp - tests of zxlib/zxaa.h: the hash table, and its form with
// string keys.

#include "zxaa.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <climits>
#include <cstdio>
#include <cstring>
#include <functional>
#include <map>
#include <optional>
#include <random>
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

}  // namespace
