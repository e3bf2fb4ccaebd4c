// zxistr_test.cpp - strings behind an interface: identifiers as bytes, the
// operations by their places in the table and by their names, the count of
// references, the reports of living objects, the holder.
// Tests zxlib/zxguid.h, zxistr.h and zxistr.cpp.
#include "zxistr.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include "kit/failure.h"
#include "kit/text.h"
#include "zxguid.h"

namespace {

constexpr zxGuid k_other_guid = {
    0x6533210E,
    0x99B8,
    0x4A00,
    {0xB5, 0xD6, 0xD3, 0xE2, 0x55, 0xBE, 0x55, 0xB6}};

using kit::text_of;

std::string text_of(IZxStr* object) {
  return std::string(object->data(), zx_size(object->length()));
}

// Records the reports of living objects while one lives.
class Reports {
 public:
  Reports() {
    lines.clear();
    zx_object_hooks.add_ref = [](const char* name) {
      lines.push_back(std::string("+") + name);
    };
    zx_object_hooks.release = [](const char* name) {
      lines.push_back(std::string("-") + name);
    };
  }
  Reports(const Reports&) = delete;
  Reports& operator=(const Reports&) = delete;
  ~Reports() { zx_object_hooks = before; }

  static inline std::vector<std::string> lines;

 private:
  ZxObjectHooks before = zx_object_hooks;
};
using Lines = std::vector<std::string>;
const std::string k_added = "+zxIStrImpl";
const std::string k_released = "-zxIStrImpl";

// The objects that the allocator slot has given and not taken back.
class Blocks {
 public:
  Blocks() {
    alive = 0;
    before = zx_realloc;
    zx_realloc = [](void* block, std::size_t size) {
      if (block == nullptr) ++alive;
      if (size == 0) --alive;
      return before(block, size);
    };
  }
  Blocks(const Blocks&) = delete;
  Blocks& operator=(const Blocks&) = delete;
  ~Blocks() { zx_realloc = before; }

  static inline int alive;

 private:
  static inline zxReallocFunction before;
};

// ---- identifiers

std::string bytes_of(const zxGuid& id) {
  return {reinterpret_cast<const char*>(&id), sizeof id};
}

TEST(zxistr, identifiers_lie_in_memory_as_told) {
  EXPECT_EQ(bytes_of(k_guid_istr),
            std::string("\x6A\xBB\xF8\xEB\xC8\xA7\x05\x4B"
                        "\x98\x56\xB3\x20\x56\xD7\x26\x2F",
                        16));
  EXPECT_EQ(bytes_of(k_guid_unknown),
            std::string("\0\0\0\0\0\0\0\0\xC0\0\0\0\0\0\0\x46", 16));
}

TEST(zxistr, identifiers_are_equal_in_all_their_parts) {
  static_assert(k_guid_istr == k_guid_istr);
  static_assert(k_guid_istr != k_guid_unknown);
  for (std::size_t i = 0; i < sizeof(zxGuid); ++i) {
    zxGuid other = k_guid_istr;
    reinterpret_cast<unsigned char*>(&other)[i] ^= 1;
    EXPECT_FALSE(other == k_guid_istr) << i;
  }
}

// ---- the object

TEST(zxistr, a_new_object_has_the_text_and_one_reference) {
  IZxStr* const object = make_istr("abc");
  EXPECT_EQ(object->length(), 3);
  EXPECT_STREQ(object->data(), "abc");
  EXPECT_EQ(object->AddRef(), 2U);
  EXPECT_EQ(object->Release(), 1U);
  EXPECT_EQ(object->Release(), 0U);
}

TEST(zxistr, the_text_is_changed_through_the_interface) {
  const zxStr initial = "abc";
  IZxStr* const object = make_istr(initial);
  object->append("d\0e", 3);
  EXPECT_EQ(text_of(object), std::string("abcd\0e", 6));
  EXPECT_EQ(object->data()[6], '\0');
  object->set_length(2);
  EXPECT_EQ(text_of(object), "ab");
  object->set_length(4);
  EXPECT_EQ(text_of(object), std::string("ab\0\0", 4));
  object->append("", 0);
  EXPECT_EQ(object->length(), 4);
  object->clear();
  EXPECT_EQ(object->length(), 0);
  EXPECT_STREQ(object->data(), "");
  object->append("x", 1);
  EXPECT_EQ(text_of(object), "x");
  EXPECT_EQ(text_of(initial), "abc");
  object->Release();
}

TEST(zxistr, arguments_are_checked_as_those_of_strings) {
  IZxStr* const object = make_istr("abc");
  EXPECT_ASSERTION(object->append(nullptr, 1), "zxstr");
  EXPECT_ASSERTION(object->append(nullptr, 0), "zxstr");
  EXPECT_ASSERTION(object->append("x", -1), "zxstr");
  EXPECT_ASSERTION(object->set_length(-1), "zxstr");
  kit::with_failures_dropped([&] {
    object->append(nullptr, 1);
    object->append("x", INT_MIN);
    object->set_length(INT_MIN);
  });
  EXPECT_EQ(text_of(object), "abc");
  object->Release();
}

TEST(zxistr, the_last_release_gives_everything_back) {
  const Blocks blocks;
  IZxStr* const object = make_istr("a text of its own");
  EXPECT_GT(blocks.alive, 0);
  object->AddRef();
  object->append("more", 4);
  object->Release();
  EXPECT_GT(blocks.alive, 0);
  object->Release();
  EXPECT_EQ(blocks.alive, 0);
}

TEST(zxistr, the_object_answers_two_identifiers) {
  IZxStr* const object = make_istr("abc");
  for (const zxGuid& id : {k_guid_istr, k_guid_unknown}) {
    void* found = nullptr;
    EXPECT_EQ(object->QueryInterface(id, &found), 0);
    EXPECT_EQ(found, object);
    EXPECT_EQ(object->Release(), 1U);  // the reference that was added
  }
  void* found = object;
  EXPECT_EQ(
      static_cast<std::uint32_t>(object->QueryInterface(k_other_guid, &found)),
      0x80004002U);
  EXPECT_EQ(found, nullptr);
  EXPECT_EQ(object->Release(), 0U);
}

TEST(zxistr, an_interface_needs_a_place) {
  IZxStr* const object = make_istr("abc");
  for (const zxGuid& id : {k_guid_istr, k_other_guid}) {
    EXPECT_ASSERTION(object->QueryInterface(id, nullptr), "zxistr");
    kit::with_failures_dropped([&] {
      EXPECT_EQ(static_cast<std::uint32_t>(object->QueryInterface(id, nullptr)),
                0x80004003U);
    });
  }
  EXPECT_EQ(object->Release(), 0U);
}

// ---- as another compiler sees it

// The object's first bytes.
struct Layout {
  void* const* operations;
  void* const* type_name;
  std::int32_t count;
};

Layout layout_of(const IZxStr* object) {
  Layout layout;
  std::memcpy(&layout, object, sizeof layout);
  return layout;
}

void set_count(IZxStr* object, std::int32_t count) {
  std::memcpy(reinterpret_cast<char*>(object) + offsetof(Layout, count), &count,
              sizeof count);
}

template <class Function>
Function operation(const IZxStr* object, std::size_t place) {
  return reinterpret_cast<Function>(layout_of(object).operations[place]);
}

TEST(zxistr, the_operations_stand_in_their_places) {
  using Query = std::int32_t(ZX_OPERATION*)(void*, const zxGuid*, void**);
  using Count = std::uint32_t(ZX_OPERATION*)(void*);
  using Length = std::int32_t(ZX_OPERATION*)(void*);
  using Data = const char*(ZX_OPERATION*)(void*);
  using SetLength = void(ZX_OPERATION*)(void*, std::int32_t);
  using Clear = void(ZX_OPERATION*)(void*);
  using Append = void(ZX_OPERATION*)(void*, const char*, std::int32_t);

  IZxStr* const object = make_istr("abc");
  void* found = nullptr;
  EXPECT_EQ(operation<Query>(object, 0)(object, &k_guid_istr, &found), 0);
  EXPECT_EQ(found, object);
  EXPECT_EQ(operation<Count>(object, 1)(object), 3U);
  EXPECT_EQ(operation<Count>(object, 2)(object), 2U);
  EXPECT_EQ(operation<Length>(object, 3)(object), 3);
  EXPECT_STREQ(operation<Data>(object, 4)(object), "abc");
  operation<SetLength>(object, 5)(object, 2);
  EXPECT_EQ(text_of(object), "ab");
  operation<Append>(object, 7)(object, "xyz", 2);
  EXPECT_EQ(text_of(object), "abxy");
  operation<Clear>(object, 6)(object);
  EXPECT_EQ(text_of(object), "");
  EXPECT_EQ(operation<Count>(object, 2)(object), 1U);
  EXPECT_EQ(operation<Count>(object, 2)(object), 0U);
}

TEST(zxistr, the_fields_stand_in_their_order) {
  IZxStr* const object = make_istr("abc");
  EXPECT_EQ(layout_of(object).count, 1);
  object->AddRef();
  EXPECT_EQ(layout_of(object).count, 2);
  object->Release();
  EXPECT_EQ(layout_of(object).count, 1);

  auto* const bytes = reinterpret_cast<char*>(object);
  const auto* const named =
      reinterpret_cast<const zxTypeName*>(bytes + sizeof(void*));
  EXPECT_STREQ(named->type_name(), "zxIStrImpl");
  const auto* const text =
      reinterpret_cast<const zxStr*>(bytes + sizeof(Layout));
  EXPECT_EQ(text_of(*text), "abc");
  object->Release();
}

// ---- the count

TEST(zxistr, a_release_too_many_fails_an_assertion) {
  IZxStr* const object = make_istr("abc");
  const Reports reports;
  for (const std::int32_t count : {0, -1, INT_MIN}) {
    set_count(object, count);
    EXPECT_FAILURE(object->Release(), "1000: bailed out: zxistr:62 ",
                   "[1000-1000-0/E-0/E/zxistr:62/]");
    kit::with_failures_dropped([&] { EXPECT_EQ(object->Release(), 0U); });
    EXPECT_EQ(layout_of(object).count, count);
    EXPECT_STREQ(object->data(), "abc");
  }
  EXPECT_EQ(reports.lines, Lines());
  set_count(object, 1);
  EXPECT_EQ(object->Release(), 0U);
}

TEST(zxistr, references_added_and_released_are_reported) {
  const Reports reports;
  IZxStr* const object = make_istr("abc");
  EXPECT_EQ(reports.lines, Lines());  // the first one was not added
  object->AddRef();
  EXPECT_EQ(reports.lines, (Lines{k_added}));
  void* found = nullptr;
  object->QueryInterface(k_other_guid, &found);
  EXPECT_EQ(reports.lines, (Lines{k_added}));
  object->QueryInterface(k_guid_unknown, &found);
  EXPECT_EQ(reports.lines, (Lines{k_added, k_added}));
  reports.lines.clear();
  object->Release();
  object->Release();
  EXPECT_EQ(reports.lines, (Lines{k_released, k_released}));
  object->Release();
  EXPECT_EQ(reports.lines, (Lines{k_released, k_released, k_released}));
}

// ---- the holder

TEST(zxistr, a_holder_holds_one_reference) {
  IZxStr* const object = make_istr("abc");
  {
    const IZxStrRef held = object;
    EXPECT_EQ(held.get(), object);
    EXPECT_EQ(layout_of(object).count, 2);
    {
      const IZxStrRef copy = held;
      EXPECT_EQ(copy.get(), object);
      EXPECT_EQ(layout_of(object).count, 3);
    }
    EXPECT_EQ(layout_of(object).count, 2);
    IZxStrRef other;
    EXPECT_EQ(other.get(), nullptr);
    other = held;
    EXPECT_EQ(layout_of(object).count, 3);
    const IZxStrRef moved = std::move(other);
    EXPECT_EQ(moved.get(), object);
    EXPECT_EQ(layout_of(object).count, 4);
  }
  EXPECT_EQ(layout_of(object).count, 1);
  EXPECT_EQ(object->Release(), 0U);
}

TEST(zxistr, storing_takes_the_place_of_what_was_held) {
  const Blocks blocks;
  IZxStr* const a = make_istr("a");
  IZxStr* const b = make_istr("b");
  {
    IZxStrRef held = a;
    a->Release();
    EXPECT_EQ(layout_of(a).count, 1);
    held = b;  // the end of the first
    EXPECT_EQ(layout_of(b).count, 2);
    EXPECT_STREQ(held.data(), "b");
    held = nullptr;
    EXPECT_EQ(held.get(), nullptr);
    EXPECT_EQ(layout_of(b).count, 1);
    held = nullptr;
  }
  b->Release();
  EXPECT_EQ(blocks.alive, 0);
}

TEST(zxistr, storing_what_is_held_changes_no_count_but_is_reported) {
  IZxStr* const object = make_istr("abc");
  IZxStrRef held = object;
  object->Release();
  const Reports reports;
  held = object;
  EXPECT_EQ(layout_of(object).count, 1);
  EXPECT_STREQ(held.data(), "abc");
  EXPECT_EQ(reports.lines, (Lines{k_added, k_released}));
  const IZxStrRef& same = held;
  held = same;
  EXPECT_EQ(layout_of(object).count, 1);
  EXPECT_STREQ(held.data(), "abc");
}

TEST(zxistr, a_holder_forwards_to_its_object) {
  IZxStr* const object = make_istr("abc");
  const IZxStrRef held = object;
  object->Release();
  EXPECT_EQ(held.data(), object->data());
  held.append("de", 2);
  EXPECT_EQ(text_of(object), "abcde");
  held.set_length(1);
  EXPECT_EQ(text_of(object), "a");
  held.clear();
  EXPECT_EQ(text_of(object), "");
}

TEST(zxistr, the_text_of_a_holder_is_a_string_of_its_own) {
  IZxStr* const object = make_istr(zxStr("a\0b", 3));
  const IZxStrRef held = object;
  object->Release();
  const zxStr text = to_str(held);
  EXPECT_EQ(text_of(text), std::string("a\0b", 3));
  held.clear();
  EXPECT_EQ(text_of(text), std::string("a\0b", 3));
  EXPECT_EQ(text_of(to_str(held)), "");
}

TEST(zxistr, a_holder_of_nothing_fails_assertions) {
  const IZxStrRef empty;
  const IZxStrRef null = nullptr;
  for (const IZxStrRef* held : {&empty, &null}) {
    EXPECT_ASSERTION(held->data(), "zxistr");
    EXPECT_ASSERTION(held->set_length(1), "zxistr");
    EXPECT_ASSERTION(held->clear(), "zxistr");
    EXPECT_ASSERTION(held->append("x", 1), "zxistr");
    EXPECT_ASSERTION(to_str(*held), "zxistr");
    kit::with_failures_dropped([&] {
      EXPECT_STREQ(held->data(), "");
      held->set_length(1);
      held->clear();
      held->append("x", 1);
      EXPECT_EQ(text_of(to_str(*held)), "");
    });
  }
}

}  // namespace
