// zxqva_test.cpp - tests of zxlib/zxqva.h: the growable array.

#include "zxqva.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdio>
#include <cstring>
#include <deque>
#include <random>
#include <ranges>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "kit/counted.h"
#include "kit/failure.h"
#include "zxstr.h"

namespace {

struct Here;
using Counted = kit::Counted<Here>;

struct Bytes24 {
  char bytes[24] = {};
};

// ---------------------------------------------------------------- helpers --

// The five fields as they lie in the object.
struct Fields {
  std::int32_t capacity;
  std::int32_t count;
  std::int32_t offset;
  void* base;
  void* first;
};
static_assert(sizeof(zxQVA<int>) == sizeof(Fields));
static_assert(sizeof(zxQVA<zxStr>) == sizeof(Fields));

template <class T>
Fields fields_of(const zxQVA<T>& array) {
  Fields fields;
  std::memcpy(&fields, static_cast<const void*>(&array), sizeof fields);
  return fields;
}

template <class T>
void set_fields(zxQVA<T>& array, const Fields& fields) {
  std::memcpy(static_cast<void*>(&array), &fields, sizeof fields);
}

// "capacity count offset".
template <class T>
std::string shape_of(const zxQVA<T>& array) {
  const Fields f = fields_of(array);
  return std::to_string(f.capacity) + " " + std::to_string(f.count) + " " +
         std::to_string(f.offset);
}

// Fills an array with 0, 1, 2 and so on.
void fill(zxQVA<int>& array, int count) {
  for (int i = 0; i < count; ++i) array.append(i);
}

std::vector<int> elements_of(zxQVA<int>& array) {
  std::vector<int> all;
  for (int i = 0; i < array.length(); ++i) all.push_back(array.get(i));
  return all;
}

std::vector<int> numbers(int first, int count) {
  std::vector<int> all;
  for (int i = 0; i < count; ++i) all.push_back(first + i);
  return all;
}

// While one lives, calls of the allocator slot are counted.
class SlotWatch {
 public:
  SlotWatch() {
    self = this;
    zx_realloc = [](void* block, std::size_t size) {
      ++(size == 0 ? self->frees : self->allocations);
      return self->old(block, size);
    };
  }
  ~SlotWatch() { zx_realloc = old; }
  SlotWatch(const SlotWatch&) = delete;
  SlotWatch& operator=(const SlotWatch&) = delete;

  int allocations = 0;
  int frees = 0;

 private:
  static SlotWatch* self;
  zxReallocFunction old = zx_realloc;
};
SlotWatch* SlotWatch::self = nullptr;

// ------------------------------------------------------- start and growth --

TEST(zxqva, an_array_starts_with_all_fields_zero_and_no_block) {
  const SlotWatch slot;
  {
    constinit static zxQVA<int> process_wide;
    zxQVA<int> array;
    for (const Fields& f : {fields_of(array), fields_of(process_wide)}) {
      EXPECT_EQ(f.capacity, 0);
      EXPECT_EQ(f.count, 0);
      EXPECT_EQ(f.offset, 0);
      EXPECT_EQ(f.base, nullptr);
      EXPECT_EQ(f.first, nullptr);
    }
    array.clear();
    array.set_length(0);
    array.reserve(0, 0);
  }
  EXPECT_EQ(slot.allocations + slot.frees, 0);
}

TEST(zxqva, an_array_is_not_copied) {
  static_assert(!std::is_copy_constructible_v<zxQVA<int>>);
  static_assert(!std::is_copy_assignable_v<zxQVA<int>>);
}

TEST(zxqva, small_arrays_grow_by_32_and_large_ones_by_a_sixteenth) {
  zxQVA<int> array;
  std::vector<int> capacities;
  for (int i = 0; i < 400; ++i) {
    array.append(i);
    const int capacity = array.block_capacity();
    if (capacities.empty() || capacities.back() != capacity)
      capacities.push_back(capacity);
  }
  // From 128 on i + i/16 for the element i that did not fit.
  EXPECT_EQ(capacities,
            (std::vector<int>{32,  64,  96,  128, 136, 144, 153, 162,
                              172, 182, 193, 205, 217, 230, 244, 259,
                              275, 292, 310, 329, 349, 370, 393, 417}));
  EXPECT_EQ(elements_of(array), numbers(0, 400));
}

TEST(zxqva, ref_grows_to_its_index) {
  const struct {
    int count;
    int index;
    int capacity;
  } rows[] = {
      {0, 0, 32}, {0, 5, 37},  {0, 127, 159}, {0, 128, 136}, {0, 159, 168},
      {3, 3, 32}, {3, 31, 32}, {3, 32, 64},   {3, 100, 132}, {32, 1000, 1062},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.index);
    zxQVA<int> array;
    fill(array, row.count);
    array.ref(row.index) = 5;
    EXPECT_EQ(array.length(), row.index + 1);
    EXPECT_EQ(array.block_capacity(), row.capacity);
    EXPECT_EQ(array.get(row.index), 5);
    for (int i = 0; i < row.index; ++i)
      ASSERT_EQ(array.get(i), i < row.count ? i : 0);
  }
}

TEST(zxqva, ref_behind_the_end_makes_default_elements) {
  zxQVA<Counted> array;
  for (int i = 0; i < 4; ++i) array.append(Counted(i));
  EXPECT_EQ(array.ref(4).number, 77);  // the count: one more
  EXPECT_EQ(array.length(), 5);
  EXPECT_EQ(array.ref(10).number, 77);  // the count and 5: six more
  EXPECT_EQ(array.length(), 11);
  EXPECT_EQ(Counted::alive, 11);
  EXPECT_EQ(array.ref(2).number, 2);
  EXPECT_EQ(array.length(), 11);
  for (int i = 4; i < 11; ++i) EXPECT_EQ(array.get(i).number, 77);
  array.clear();
  EXPECT_EQ(Counted::alive, 0);
}

TEST(zxqva, an_argument_of_append_may_be_an_element) {
  zxQVA<zxStr> array;
  array.append("the first of them");
  for (int i = 1; i < 300; ++i) {
    array.append(array.get(i / 2));
    ASSERT_TRUE(array.last() == "the first of them") << i;
  }
  EXPECT_EQ(array.get(0).representation()->refs, 300);
  array.ref(299) = array.get(0);
  EXPECT_EQ(array.get(0).representation()->refs, 300);
}

// ---------------------------------------------------------------- reading --

TEST(zxqva, elements_are_reached_from_both_ends) {
  zxQVA<int> array;
  fill(array, 5);
  EXPECT_EQ(array.get(0), 0);
  EXPECT_EQ(array.get(4), 4);
  EXPECT_EQ(array.from_top(0), 4);
  EXPECT_EQ(array.from_top(4), 0);
  EXPECT_EQ(array.last(), 4);
  EXPECT_EQ(array.get_or(3), 3);
  array.get(0) = 10;
  array.last() = 14;
  array.from_top(1) = 13;
  EXPECT_EQ(elements_of(array), (std::vector<int>{10, 1, 2, 13, 14}));
  const zxQVA<int>& constant = array;
  EXPECT_EQ(constant.get(0), 10);
  EXPECT_EQ(constant.get_or(4), 14);
}

TEST(zxqva, indexes_out_of_range_are_assertions) {
  for (const int count : {0, 3}) {
    zxQVA<int> array;
    fill(array, count);
    const zxQVA<int>& constant = array;
    for (const int i : {-1, count, count + 1, 32, INT_MAX, INT_MIN}) {
      SCOPED_TRACE(i);
      EXPECT_ASSERTION(array.get(i), "zxqva");
      EXPECT_ASSERTION(constant.get(i), "zxqva");
      EXPECT_ASSERTION(array.from_top(i), "zxqva");
    }
    EXPECT_ASSERTION(array.ref(-1), "zxqva");
    EXPECT_ASSERTION(array.ref(INT_MIN), "zxqva");
    EXPECT_ASSERTION(array.grow_to(-1), "zxqva");
    EXPECT_EQ(elements_of(array), numbers(0, count));
  }
}

TEST(zxqva, get_or_gives_the_shared_empty_value_out_of_range) {
  zxQVA<zxStr> array;
  array.append("a");
  for (const int i : {-1, 1, 31, INT_MAX, INT_MIN}) {
    EXPECT_TRUE(array.get_or(i).is_empty());
    EXPECT_EQ(&array.get_or(i), &array.get_or(-5));
  }
  EXPECT_TRUE(array.get_or(0) == "a");
  EXPECT_EQ(array.length(), 1);
  EXPECT_EQ(zxQVA<int>().get_or(0), 0);
}

// -------------------------------------------------------------- iterating --

TEST(zxqva, begin_and_end_span_the_live_elements) {
  zxQVA<int> array;
  const zxQVA<int>& constant = array;
  EXPECT_EQ(array.begin(), array.end());
  EXPECT_EQ(constant.begin(), constant.end());
  fill(array, 10);
  EXPECT_EQ(array.begin(), fields_of(array).base);
  EXPECT_EQ(array.end() - array.begin(), 10);
  EXPECT_EQ(array.begin(), &array.get(0));
  EXPECT_EQ(constant.begin(), array.begin());
  EXPECT_EQ(constant.end(), array.end());
  array.drop_first();
  array.drop_first();
  array.drop_last();
  EXPECT_EQ(std::vector<int>(array.begin(), array.end()), numbers(2, 7));
  array.slide_to(20);
  EXPECT_EQ(std::vector<int>(constant.begin(), constant.end()), numbers(2, 7));
  array.set_length(0);
  EXPECT_EQ(array.begin(), array.end());
  array.clear();
  EXPECT_EQ(array.begin(), nullptr);
  EXPECT_EQ(array.end(), nullptr);
  static_assert(std::is_same_v<decltype(array.begin()), int*>);
  static_assert(std::is_same_v<decltype(constant.end()), const int*>);
  static_assert(std::ranges::contiguous_range<zxQVA<zxStr>&>);
  static_assert(std::ranges::contiguous_range<const zxQVA<zxStr>&>);
}

template <class T>
concept has_begin = requires(T&& t) {
  static_cast<T&&>(t).begin();
};
template <class T>
concept has_end = requires(T&& t) {
  static_cast<T&&>(t).end();
};

TEST(zxqva, a_temporary_is_not_gone_through) {
  using Array = zxQVA<zxStr>;
  static_assert(has_begin<Array&> && has_begin<const Array&>);
  static_assert(has_end<Array&> && has_end<const Array&>);
  static_assert(!has_begin<Array> && !has_begin<const Array>);
  static_assert(!has_end<Array> && !has_end<const Array>);
}

TEST(zxqva, a_loop_reads_and_writes_the_elements) {
  zxQVA<int> array;
  for (const int n : array) FAIL() << n;
  fill(array, 40);
  for (int i = 0; i < 5; ++i) array.drop_first();
  for (int& n : array) n *= 2;
  int expected = 10;
  for (const int n : std::as_const(array)) {
    EXPECT_EQ(n, expected);
    expected += 2;
  }
  EXPECT_EQ(expected, 80);
}

TEST(zxqva, the_algorithms_of_the_standard_work_on_an_array) {
  zxQVA<int> array;
  for (int i = 0; i < 500; ++i) array.append(i * 7919 % 503);
  for (int i = 0; i < 100; ++i) array.drop_first();
  std::vector<int> model(array.begin(), array.end());
  EXPECT_EQ(model, elements_of(array));
  std::sort(array.begin(), array.end());
  std::sort(model.begin(), model.end());
  EXPECT_EQ(elements_of(array), model);
  EXPECT_EQ(std::ranges::find(array, model[77]), array.begin() + 77);
  EXPECT_EQ(std::ranges::find(array, 1000), array.end());
  EXPECT_EQ(std::ranges::max(array), model.back());
  std::ranges::reverse(array);
  std::ranges::reverse(model);
  EXPECT_EQ(elements_of(array), model);
  // The blocks went on from 417: 443, 470, 499, 530.
  EXPECT_EQ(shape_of(array), "530 400 100");
  // Elements that are not wanted are moved behind the others and cut off.
  const auto rest =
      std::ranges::remove_if(array, [](int n) { return n % 2 != 0; });
  array.set_length(static_cast<int>(rest.begin() - array.begin()));
  std::erase_if(model, [](int n) { return n % 2 != 0; });
  EXPECT_EQ(elements_of(array), model);
}

TEST(zxqva, sorting_keeps_each_element_once) {
  zxQVA<zxStr> array;
  for (int i = 0; i < 300; ++i)
    array.append(zxStr(std::to_string(i * 7919 % 307)));
  array.append(array.get(5));
  std::sort(array.begin(), array.end());
  EXPECT_TRUE(std::is_sorted(array.begin(), array.end()));
  int shared = 0;
  for (const zxStr& text : array) shared += text.representation()->refs == 2;
  EXPECT_EQ(shared, 2);
}

// -------------------------------------------------------- stack and queue --

TEST(zxqva, elements_leave_at_the_end) {
  zxQVA<Counted> array;
  for (int i = 0; i < 3; ++i) array.append(Counted(i));
  EXPECT_EQ(array.pop_last().number, 2);
  EXPECT_EQ(Counted::alive, 2);
  array.drop_last();
  EXPECT_EQ(Counted::alive, 1);
  EXPECT_EQ(array.last().number, 0);
  EXPECT_EQ(shape_of(array), "32 1 0");
  array.append(Counted(9));
  EXPECT_EQ(array.last().number, 9);
  array.clear();
  EXPECT_EQ(Counted::alive, 0);
}

TEST(zxqva, elements_leave_at_the_front_by_moving_the_start) {
  zxQVA<Counted> array;
  for (int i = 0; i < 3; ++i) array.append(Counted(i));
  const Counted* second = &array.get(1);
  EXPECT_EQ(array.pop_first().number, 0);
  EXPECT_EQ(shape_of(array), "32 2 1");
  EXPECT_EQ(&array.get(0), second);
  array.drop_first();
  EXPECT_EQ(array.get(0).number, 2);
  EXPECT_EQ(array.block_offset(), 2);
  EXPECT_EQ(Counted::alive, 1);
  array.drop_first();
  EXPECT_EQ(shape_of(array), "32 0 3");
  EXPECT_EQ(Counted::alive, 0);
}

TEST(zxqva, taking_from_an_empty_array_is_an_assertion) {
  zxQVA<int> array;
  fill(array, 2);
  array.drop_first();
  array.drop_first();
  EXPECT_ASSERTION(array.drop_last(), "zxqva");
  EXPECT_ASSERTION(array.pop_last(), "zxqva");
  EXPECT_ASSERTION(array.drop_first(), "zxqva");
  EXPECT_ASSERTION(array.pop_first(), "zxqva");
  EXPECT_ASSERTION(array.last(), "zxqva");
  EXPECT_ASSERTION(array.from_top(0), "zxqva");
  EXPECT_EQ(shape_of(array), "32 0 2");
}

TEST(zxqva, a_queue_in_balance_allocates_nothing) {
  for (const int live : {1, 5, 31, 32}) {
    SCOPED_TRACE(live);
    zxQVA<int> queue;
    fill(queue, live);
    const SlotWatch slot;
    for (int i = 0; i < 1000; ++i) {
      // With 32 live ones there is no room but that of the removed.
      if (live < 32) queue.append(live + i);
      ASSERT_EQ(queue.pop_first(), i);
      if (live == 32) queue.append(live + i);
    }
    EXPECT_EQ(queue.block_capacity(), 32);
    EXPECT_EQ(elements_of(queue), numbers(1000, live));
    EXPECT_EQ(slot.allocations + slot.frees, 0);
  }
}

TEST(zxqva, the_room_in_front_is_taken_back_when_the_end_is_reached) {
  zxQVA<int> array;
  fill(array, 32);
  for (int i = 0; i < 20; ++i) array.drop_first();
  EXPECT_EQ(shape_of(array), "32 12 20");
  array.append(32);
  EXPECT_EQ(shape_of(array), "32 13 0");
  EXPECT_EQ(elements_of(array), numbers(20, 13));
}

TEST(zxqva, growth_takes_the_room_in_front_back) {
  zxQVA<int> array;
  fill(array, 32);
  for (int i = 0; i < 20; ++i) array.drop_first();
  array.ref(40) = 1;
  EXPECT_EQ(shape_of(array), "72 41 0");
  EXPECT_EQ(array.get(0), 20);
  EXPECT_EQ(array.get(11), 31);
  EXPECT_EQ(array.get(12), 0);
}

TEST(zxqva, elements_made_in_front_push_the_others_back) {
  zxQVA<zxStr> array;
  array.append("c");
  array.append("d");
  array.grow_front(2);
  EXPECT_TRUE(array.get(0).is_empty());
  array.get(0) = "a";
  array.get(1) = "b";
  std::string all;
  for (const zxStr& text : array) all += text.c_str();
  EXPECT_EQ(all, "abcd");
}

TEST(zxqva, room_in_front_is_made_for_as_many_again) {
  zxQVA<int> array;
  fill(array, 10);  // in a block of 32
  array.grow_front(3);
  EXPECT_EQ(shape_of(array), "32 13 10");
  array.grow_front(10);
  EXPECT_EQ(shape_of(array), "32 23 0");
  array.grow_front(1);
  EXPECT_EQ(shape_of(array), "47 24 23");
  array.grow_front(0);
  EXPECT_EQ(shape_of(array), "47 24 23");
  zxQVA<int> empty;
  empty.grow_front(0);
  EXPECT_EQ(shape_of(empty), "0 0 0");
  empty.grow_front(1);
  EXPECT_EQ(shape_of(empty), "1 1 0");
}

// As many moves as elements, give or take, and not their square.
TEST(zxqva, a_million_elements_go_in_front_one_by_one) {
  zxQVA<int> array;
  constexpr int k_count = 1'000'000;
  for (int i = 0; i < k_count; ++i) {
    array.grow_front(1);
    array.get(0) = i;
  }
  for (int i = 0; i < k_count; ++i) ASSERT_EQ(array.get(i), k_count - 1 - i);
}

// ----------------------------------------------------------------- sizing --

TEST(zxqva, set_length_destroys_or_makes_elements) {
  zxQVA<Counted> array;
  array.set_length(10);
  EXPECT_EQ(array.length(), 10);
  EXPECT_EQ(Counted::alive, 10);
  EXPECT_EQ(array.get(9).number, 77);
  const int capacity = array.block_capacity();
  array.set_length(4);
  EXPECT_EQ(Counted::alive, 4);
  array.set_length(0);
  EXPECT_EQ(Counted::alive, 0);
  EXPECT_EQ(array.block_capacity(), capacity);  // keeps the block
  array.set_length(3);
  EXPECT_EQ(Counted::alive, 3);
  array.clear();
  EXPECT_EQ(Counted::alive, 0);
  EXPECT_EQ(fields_of(array).base, nullptr);
  EXPECT_EQ(shape_of(array), "0 0 0");
}

TEST(zxqva, set_length_of_a_negative_number_is_an_assertion) {
  zxQVA<int> array;
  fill(array, 2);
  EXPECT_ASSERTION(array.set_length(-1), "zxqva");
  EXPECT_ASSERTION(array.set_length(INT_MIN), "zxqva");
  EXPECT_EQ(elements_of(array), numbers(0, 2));
}

TEST(zxqva, clear_frees_the_block_and_its_hidden_start) {
  SlotWatch slot;
  zxQVA<int> array;
  fill(array, 5);
  array.drop_first();
  array.clear();
  EXPECT_EQ(shape_of(array), "0 0 0");
  EXPECT_EQ(slot.frees, 1);
  array.append(1);
  EXPECT_EQ(shape_of(array), "32 1 0");
}

TEST(zxqva, reserve_makes_the_block_hold_exactly_n_behind_the_offset) {
  const struct {
    int n;
    int new_offset;
    const char* shape;  // of 5 elements in 32 with 2 skipped
  } rows[] = {
      {0, 0, "32 5 2"},                          // below the count: nothing
      {4, 9, "32 5 2"},        {5, 0, "5 5 0"},  // shrinks
      {5, 3, "8 5 3"},         {10, 2, "12 5 2"},
      {32, 0, "32 5 0"},  // the same size: slides
      {30, 2, "32 5 2"},       {27, 5, "32 5 5"},
      {5, 27, "32 5 27"},      {33, 0, "33 5 0"},  // grows
      {32, 2, "34 5 2"},       {5, 50, "55 5 50"},
      {100, 100, "200 5 100"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.shape);
    zxQVA<int> array;
    fill(array, 7);
    array.drop_first();
    array.drop_first();
    ASSERT_EQ(shape_of(array), "32 5 2");
    array.reserve(row.n, row.new_offset);
    EXPECT_EQ(shape_of(array), row.shape);
    EXPECT_EQ(elements_of(array), numbers(2, 5));
  }
}

TEST(zxqva, reserve_on_an_empty_array_makes_or_frees_the_block) {
  zxQVA<int> array;
  array.reserve(0, 4);
  EXPECT_EQ(shape_of(array), "4 0 4");
  array.append(1);  // the room in front is taken back
  EXPECT_EQ(shape_of(array), "4 1 0");
  array.drop_last();
  array.reserve(0, 0);
  EXPECT_EQ(shape_of(array), "0 0 0");
  array.reserve(7, 0);
  EXPECT_EQ(shape_of(array), "7 0 0");
  fill(array, 7);
  EXPECT_EQ(shape_of(array), "7 7 0");
  array.append(7);  // 7 + 32
  EXPECT_EQ(shape_of(array), "39 8 0");
}

TEST(zxqva, negative_sizes_are_assertions) {
  zxQVA<int> array;
  fill(array, 2);
  EXPECT_ASSERTION(array.reserve(-1, 0), "zxqva");
  EXPECT_ASSERTION(array.reserve(5, -1), "zxqva");
  EXPECT_ASSERTION(array.reserve(INT_MIN, INT_MIN), "zxqva");
  EXPECT_ASSERTION(array.slide_to(-1), "zxqva");
  EXPECT_ASSERTION(array.grow_front(-1), "zxqva");
  EXPECT_EQ(shape_of(array), "32 2 0");
}

TEST(zxqva, slide_to_moves_the_elements_within_the_block) {
  zxQVA<int> array;
  fill(array, 10);
  for (const int offset : {22, 0, 5, 3, 3, 20, 22, 1}) {
    array.slide_to(offset);
    EXPECT_EQ(array.block_offset(), offset);
    EXPECT_EQ(elements_of(array), numbers(0, 10));
  }
  for (const int offset : {23, 32, INT_MAX})
    EXPECT_ASSERTION(array.slide_to(offset), "zxqva");
  EXPECT_EQ(shape_of(array), "32 10 1");
}

TEST(zxqva, grow_to_an_element_that_is_there_does_nothing) {
  zxQVA<int> array;
  fill(array, 3);
  array.grow_to(2);
  array.grow_to(0);
  EXPECT_EQ(shape_of(array), "32 3 0");
  array.grow_to(3);
  EXPECT_EQ(shape_of(array), "32 4 0");
}

// -------------------------------------------------------------- the limit --

// The largest count, unknown to the compiler, which else warns of the block
// that it would be.
volatile int most = INT_MAX;

// Stands in the slot for memory that nobody has.
void* no_memory(void*, std::size_t) {
  bail_code(2000);
  return nullptr;
}

// The largest block of a type is just below 4 GiB.
template <class T>
void expect_limit(int limit) {
  SCOPED_TRACE(sizeof(T));
  constexpr auto k_too_big = "2205: zxva: tbl too big";
  constexpr auto k_line = "[2205-2205-0/E-0/E//]";
  zxQVA<T> array;
  array.append(T());
  const zxReallocFunction old = zx_realloc;
  zx_realloc = no_memory;
  EXPECT_FAILURE(array.reserve(limit, 0), k_too_big, k_line);
  EXPECT_FAILURE(array.reserve(1, limit - 1), k_too_big, k_line);
  EXPECT_FAILURE(array.reserve(INT_MAX, 0), k_too_big, k_line);
  EXPECT_FAILURE(array.reserve(INT_MAX, INT_MAX), k_too_big, k_line);
  EXPECT_FAILURE(array.ref(INT_MAX), k_too_big, k_line);
  EXPECT_FAILURE(array.grow_to(INT_MAX), k_too_big, k_line);
  EXPECT_FAILURE(array.grow_front(most), k_too_big, k_line);
  EXPECT_FAILURE(array.set_length(INT_MAX), k_too_big, k_line);
  // One less is asked of the heap.
  EXPECT_FAILURE(array.reserve(limit - 1, 0), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
  zx_realloc = old;
  EXPECT_EQ(shape_of(array), "32 1 0");
}

TEST(zxqva, blocks_end_below_32_bits_of_bytes) {
  expect_limit<std::int32_t>(0x3FFFFFFF);
  expect_limit<std::int64_t>(0x1FFFFFFF);
  expect_limit<Bytes24>(0xAAAAAAA);
  expect_limit<std::int16_t>(0x7FFFFFFF);
}

TEST(zxqva, counts_of_bytes_end_with_31_bits) {
  zxQVA<char> array;
  EXPECT_FAILURE(array.reserve(INT_MAX, INT_MAX), "2205: zxva: tbl too big",
                 "[2205-2205-0/E-0/E//]");
  EXPECT_FAILURE(array.reserve(INT_MAX, 1), "2205: zxva: tbl too big",
                 "[2205-2205-0/E-0/E//]");
  // As many as a count can tell are asked of the heap.
  const zxReallocFunction old = zx_realloc;
  zx_realloc = no_memory;
  EXPECT_FAILURE(array.reserve(INT_MAX, 0), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
  EXPECT_FAILURE(array.reserve(1, INT_MAX - 1), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
  zx_realloc = old;
  EXPECT_EQ(shape_of(array), "0 0 0");
}

// ------------------------------------------- corruption, dropped failures --

struct Operation {
  const char* name;
  void (*call)(zxQVA<int>&);
};

const Operation k_checked_operations[] = {
    {"get", [](zxQVA<int>& a) { a.get(0); }},
    {"const get", [](zxQVA<int>& a) { std::as_const(a).get(0); }},
    {"ref", [](zxQVA<int>& a) { a.ref(0); }},
    {"ref behind", [](zxQVA<int>& a) { a.ref(100); }},
    {"get_or", [](zxQVA<int>& a) { a.get_or(0); }},
    {"append", [](zxQVA<int>& a) { a.append(1); }},
    {"drop_last", [](zxQVA<int>& a) { a.drop_last(); }},
    {"pop_last", [](zxQVA<int>& a) { a.pop_last(); }},
    {"drop_first", [](zxQVA<int>& a) { a.drop_first(); }},
    {"pop_first", [](zxQVA<int>& a) { a.pop_first(); }},
    {"set_length", [](zxQVA<int>& a) { a.set_length(1); }},
    {"set_length up", [](zxQVA<int>& a) { a.set_length(100); }},
    {"clear", [](zxQVA<int>& a) { a.clear(); }},
    {"reserve", [](zxQVA<int>& a) { a.reserve(100, 0); }},
    {"grow_to", [](zxQVA<int>& a) { a.grow_to(100); }},
    {"slide_to", [](zxQVA<int>& a) { a.slide_to(1); }},
    {"grow_front", [](zxQVA<int>& a) { a.grow_front(1); }},
};

const struct {
  const char* name;
  void (*corrupt)(Fields&);
} k_corruptions[] = {
    {"negative capacity", [](Fields& f) { f.capacity = -1; }},
    {"negative count", [](Fields& f) { f.count = -1; }},
    {"negative offset", [](Fields& f) { f.offset = -1; }},
    {"count above capacity", [](Fields& f) { f.count = 33; }},
    {"offset above capacity", [](Fields& f) { f.offset = 30; }},
    {"sum beyond 32 bits",
     [](Fields& f) { f.offset = INT_MAX, f.count = INT_MAX; }},
    {"first beside base",
     [](Fields& f) { f.first = static_cast<char*>(f.first) + 1; }},
    {"first without base", [](Fields& f) { f.base = nullptr; }},
};

TEST(zxqva, every_operation_finds_a_corrupt_array) {
  for (const auto& corruption : k_corruptions) {
    for (const Operation& operation : k_checked_operations) {
      SCOPED_TRACE(std::string(corruption.name) + ", " + operation.name);
      zxQVA<int> array;
      fill(array, 5);
      const Fields good = fields_of(array);
      Fields bad = good;
      corruption.corrupt(bad);
      set_fields(array, bad);
      EXPECT_ASSERTION(operation.call(array), "zxqva");
      kit::with_failures_dropped([&] { operation.call(array); });
      const Fields now = fields_of(array);
      EXPECT_EQ(now.capacity, bad.capacity);
      EXPECT_EQ(now.count, bad.count);
      EXPECT_EQ(now.offset, bad.offset);
      EXPECT_EQ(now.first, bad.first);
      set_fields(array, good);
      EXPECT_EQ(elements_of(array), numbers(0, 5));
    }
  }
}

TEST(zxqva, a_dropped_failure_gives_a_neutral_value_and_changes_nothing) {
  zxQVA<zxStr> array;
  array.append("a");
  array.append("b");
  kit::with_failures_dropped([&] {
    for (const int i : {-1, 2, INT_MAX, INT_MIN}) {
      EXPECT_TRUE(array.get(i).is_empty());
      array.get(i) = "lost";
      EXPECT_TRUE(array.get(i).is_empty());
      EXPECT_TRUE(std::as_const(array).get(i).is_empty());
      array.from_top(i) = "lost";
      EXPECT_TRUE(array.from_top(i).is_empty());
    }
    array.ref(-1) = "lost";
    EXPECT_TRUE(array.ref(-1).is_empty());
    array.ref(INT_MAX) = "lost";  // message 2205
    array.grow_to(-1);
    array.grow_to(INT_MAX);
    array.set_length(-1);
    array.set_length(INT_MAX);
    array.reserve(-1, 0);
    array.reserve(INT_MAX, INT_MAX);
    array.slide_to(31);
    array.grow_front(-1);
    array.grow_front(most);
  });
  EXPECT_EQ(shape_of(array), "32 2 0");
  EXPECT_TRUE(array.get(0) == "a");
  EXPECT_TRUE(array.get(1) == "b");
}

TEST(zxqva, a_dropped_failure_on_an_empty_array_changes_nothing) {
  zxQVA<zxStr> array;
  kit::with_failures_dropped([&] {
    EXPECT_TRUE(array.last().is_empty());
    array.last() = "lost";
    EXPECT_TRUE(array.last().is_empty());
    EXPECT_TRUE(array.pop_last().is_empty());
    EXPECT_TRUE(array.pop_first().is_empty());
    array.drop_last();
    array.drop_first();
  });
  EXPECT_EQ(shape_of(array), "0 0 0");
  EXPECT_TRUE(array.get_or(0).is_empty());
}

// --------------------------------------------- random use against a model --

// The rules of the block, told with plain numbers, over a deque.
struct Model {
  std::deque<std::string> all;
  int capacity = 0;
  int offset = 0;

  int count() const { return static_cast<int>(all.size()); }

  void reserve(int n, int new_offset) {
    if (n < count()) return;
    capacity = n + new_offset;
    offset = new_offset;
  }
  void grow_to(int i) {
    if (i < count()) return;
    if (i + offset >= capacity) {
      if (i >= capacity)
        reserve(i < 128 ? i + 32 : i + i / 16, 0);
      else
        offset = 0;
    }
    all.resize(static_cast<std::size_t>(i) + 1);
  }
  void append(const std::string& text) {
    if (offset + count() >= capacity)
      grow_to(count());
    else
      all.emplace_back();
    all.back() = text;
  }
  void drop_first() {
    all.pop_front();
    ++offset;
  }
  void grow_front(int n) {
    if (n > offset) {
      capacity = std::max(capacity, n + 2 * count());
      offset = n + count();
    }
    offset -= n;
    all.insert(all.begin(), static_cast<std::size_t>(n), "");
  }
  void set_length(int n) {
    if (n > count())
      grow_to(n - 1);
    else
      all.resize(static_cast<std::size_t>(n));
  }
};

class Pair {
 public:
  explicit Pair(unsigned seed) : random(seed) {}

  void step() {
    const std::string text = std::to_string(random());
    const int i = static_cast<int>(random() % 40);
    switch (random() % 15) {
      case 0:
      case 1:
      case 2:
      case 3:
        real.append(text.c_str());
        model.append(text);
        break;
      case 4:
      case 5:
        take_first();
        break;
      case 6:
        take_last();
        break;
      case 7:
        real.ref(i) = text.c_str();
        model.grow_to(i);
        model.all[static_cast<std::size_t>(i)] = text;
        break;
      case 8:
        append_element(i);
        break;
      case 9:
        real.reserve(i * 4, i);
        model.reserve(i * 4, i);
        break;
      case 10:
        slide(i);
        break;
      case 11:
        grow_far();
        break;
      case 12:
        cut();
        break;
      case 13:
        real.grow_front(i);
        model.grow_front(i);
        break;
      default:
        ASSERT_EQ(
            as_string(real.get_or(i)),
            i < model.count() ? model.all[static_cast<std::size_t>(i)] : "");
    }
  }

  void check() {
    ASSERT_EQ(real.length(), model.count());
    ASSERT_EQ(real.block_capacity(), model.capacity);
    ASSERT_EQ(real.block_offset(), model.offset);
    for (int i = 0; i < model.count(); ++i)
      ASSERT_EQ(as_string(real.get(i)), model.all[static_cast<std::size_t>(i)]);
    ASSERT_TRUE(std::ranges::equal(
        std::as_const(real), model.all,
        [](const zxStr& a, const std::string& b) { return a == b.c_str(); }));
    if (model.count() == 0) return;
    ASSERT_EQ(as_string(real.last()), model.all.back());
    ASSERT_EQ(as_string(real.from_top(model.count() - 1)), model.all.front());
  }

 private:
  static std::string as_string(const zxStr& text) { return text.c_str(); }

  void take_first() {
    if (model.count() == 0) return;
    if (random() % 2 == 0) {
      ASSERT_EQ(as_string(real.pop_first()), model.all.front());
    } else {
      real.drop_first();
    }
    model.drop_first();
  }
  void take_last() {
    if (model.count() == 0) return;
    if (random() % 2 == 0) {
      ASSERT_EQ(as_string(real.pop_last()), model.all.back());
    } else {
      real.drop_last();
    }
    model.all.pop_back();
  }
  void append_element(int i) {
    if (model.count() == 0) return;
    i %= model.count();
    real.append(real.get(i));
    model.append(std::string(model.all[static_cast<std::size_t>(i)]));
  }
  void slide(int new_offset) {
    if (new_offset + model.count() > model.capacity) return;
    real.slide_to(new_offset);
    model.offset = new_offset;
  }
  void grow_far() {
    const int n = static_cast<int>(random() % 250);
    real.set_length(n);
    model.set_length(n);
  }
  void cut() {
    if (random() % 20 != 0) return;
    real.clear();
    model = Model();
  }

  std::mt19937 random;
  zxQVA<zxStr> real;
  Model model;
};

void run_pair(unsigned seed, int steps) {
  std::printf("seed %u\n", seed);
  Pair pair(seed);
  for (int i = 0; i < steps && !testing::Test::HasFatalFailure(); ++i) {
    SCOPED_TRACE("step " + std::to_string(i));
    pair.step();
    pair.check();
  }
}

TEST(zxqva, random_use_gives_elements_and_block_of_the_model) {
  for (const unsigned seed : {1U, 2U, 3U, 4U, 5U}) run_pair(seed, 20'000);
}

TEST(zxqva_slow, long_random_use_gives_what_the_model_gives) {
  for (unsigned seed = 100; seed < 110; ++seed) run_pair(seed, 100'000);
}

TEST(zxqva, random_use_destroys_each_element_once) {
  std::mt19937 random(7);
  std::printf("seed 7\n");
  for (int round = 0; round < 50; ++round) {
    zxQVA<Counted> array;
    for (int step = 0; step < 400; ++step) {
      switch (random() % 6) {
        case 0:
        case 1:
          array.append(Counted(step));
          break;
        case 2:
          if (array.length() > 0) array.drop_first();
          break;
        case 3:
          if (array.length() > 0) array.pop_last();
          break;
        case 4:
          array.set_length(static_cast<int>(random() % 60));
          break;
        default:
          array.reserve(static_cast<int>(random() % 80), 3);
      }
      ASSERT_EQ(Counted::alive, array.length());
    }
  }
  EXPECT_EQ(Counted::alive, 0);
}

}  // namespace
