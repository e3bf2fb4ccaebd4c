// zxstr_test.cpp - tests of zxlib/zxstr.h and its sources: the string, its
// sharing and growth, its form with room inside, and the checksums of 16 and
// of 32 bits.

#include "zxstr.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <climits>
#include <compare>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <memory>
#include <random>
#include <ranges>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "kit/failure.h"
#include "zxplat.h"
#include "zxqva.h"

namespace {

using namespace std::string_literals;
using namespace std::string_view_literals;

// ---------------------------------------------------------------- helpers --

std::string text_of(const zxStr& s) {
  return {s.c_str(), static_cast<std::size_t>(s.length())};
}

std::int32_t refs(const zxStr& s) { return s.representation()->refs; }

bool share(const zxStr& a, const zxStr& b) {
  return a.representation() == b.representation();
}

bool is_shared_empty(const zxStr& s) {
  return s.representation() == &zx_empty_rep;
}

// A string from bytes, of exactly their capacity.
zxStr str(std::string_view bytes) {
  return zxStr(bytes.data(), static_cast<std::int32_t>(bytes.size()));
}

// Text, capacity and number of holders in one comparable piece.
std::string state_of(const zxStr& s) {
  return text_of(s) + "|" + std::to_string(s.capacity()) + "|" +
         std::to_string(refs(s));
}

// While one lives, what goes through the allocator slot is noted: "new 19",
// "resize 85", "free".
class SlotWatch {
 public:
  SlotWatch() {
    self = this;
    zx_realloc = watch;
  }
  ~SlotWatch() { zx_realloc = old; }
  SlotWatch(const SlotWatch&) = delete;
  SlotWatch& operator=(const SlotWatch&) = delete;

  using Calls = std::vector<std::string>;
  Calls calls;

 private:
  static void* watch(void* block, std::size_t size) {
    const std::string name = block == nullptr ? "new " : "resize ";
    self->calls.push_back(size == 0 ? "free" : name + std::to_string(size));
    return self->old(block, size);
  }
  static SlotWatch* self;
  zxReallocFunction old = zx_realloc;
};
SlotWatch* SlotWatch::self = nullptr;

// --------------------------------------------------------- making strings --

TEST(zxstr, an_empty_string_costs_no_allocation) {
  const SlotWatch slot;
  const zxStr a;
  zxStr b;
  const zxStr c = a;
  b = a;
  b.clear();
  b.unshare();
  b.reserve(0);
  b.set_length(0);
  EXPECT_TRUE(is_shared_empty(a) && is_shared_empty(b) && is_shared_empty(c));
  EXPECT_EQ(state_of(b), "|0|0");
  EXPECT_STREQ(b.c_str(), "");
  EXPECT_TRUE(b.is_empty());
  EXPECT_EQ(slot.calls, SlotWatch::Calls());
}

TEST(zxstr, a_string_is_one_pointer) {
  static_assert(sizeof(zxStr) == sizeof(void*));
  constinit static zxStr process_wide;
  EXPECT_TRUE(is_shared_empty(process_wide));
}

TEST(zxstr, construction_takes_exactly_the_length) {
  SlotWatch slot;
  {
    const zxStr text("hello");
    EXPECT_EQ(state_of(text), "hello|5|1");
    const zxStr part("hello", 2);
    EXPECT_EQ(state_of(part), "he|2|1");
    const zxStr byte('x');
    EXPECT_EQ(state_of(byte), "x|1|1");
    const zxStr view("a\0b"sv);
    EXPECT_EQ(state_of(view), "a\0b|3|1"s);
    EXPECT_EQ(view.c_str()[3], '\0');
  }
  // The characters and 16: three counts, the NUL, three spare.
  EXPECT_EQ(slot.calls,
            (SlotWatch::Calls{"new 21", "new 18", "new 17", "new 19", "free",
                              "free", "free", "free"}));
}

TEST(zxstr, construction_from_nothing_is_empty) {
  for (const zxStr& s :
       {zxStr(""), zxStr("abc", 0), zxStr(""sv), zxStr(std::string_view())}) {
    EXPECT_EQ(s.length(), 0);
    EXPECT_TRUE(s.is_empty());
    EXPECT_STREQ(s.c_str(), "");
    EXPECT_TRUE(s == zxStr());
  }
  EXPECT_EQ(text_of(zxStr('\0')), "\0"s);
}

TEST(zxstr, construction_from_null_or_a_negative_length_is_an_assertion) {
  const char* null = nullptr;
  EXPECT_ASSERTION(zxStr(null), "zxstr");
  EXPECT_ASSERTION(zxStr(null, 0), "zxstr");
  EXPECT_ASSERTION(zxStr(null, 3), "zxstr");
  EXPECT_ASSERTION(zxStr("abc", -1), "zxstr");
  EXPECT_ASSERTION(zxStr("abc", INT32_MIN), "zxstr");
  kit::with_failures_dropped([&] {
    for (const zxStr& s : {zxStr(null), zxStr(null, 3), zxStr("abc", -1)})
      EXPECT_TRUE(is_shared_empty(s));
  });
}

// ---------------------------------------------------------------- sharing --

TEST(zxstr, a_copy_shares_and_counts) {
  SlotWatch slot;
  {
    const zxStr a("hello");
    slot.calls.clear();
    const zxStr b = a;
    EXPECT_TRUE(share(a, b));
    {
      zxStr c("x");
      slot.calls.clear();
      c = b;
      EXPECT_EQ(refs(a), 3);
      EXPECT_EQ(slot.calls, SlotWatch::Calls{"free"});  // what c had
    }
    EXPECT_EQ(refs(a), 2);
  }
  EXPECT_EQ(slot.calls, (SlotWatch::Calls{"free", "free"}));
}

TEST(zxstr, a_copy_stays_when_the_string_changes) {
  const struct {
    const char* name;
    void (*change)(zxStr&);
    std::string expected;
  } rows[] = {
      {"append byte", [](zxStr& s) { s.append('!'); }, "hello!|6|1"},
      {"append text", [](zxStr& s) { s.append(" you"); }, "hello you|9|1"},
      {"append bytes", [](zxStr& s) { s.append("\0x", 2); }, "hello\0x|7|1"s},
      {"append string", [](zxStr& s) { s.append(zxStr("ab")); }, "helloab|7|1"},
      {"append itself", [](zxStr& s) { s.append(s); }, "hellohello|10|1"},
      {"append own part", [](zxStr& s) { s.append(s.c_str() + 3); },
       "hellolo|7|1"},
      {"+= byte", [](zxStr& s) { s += '!'; }, "hello!|6|1"},
      {"+= text", [](zxStr& s) { s += " you"; }, "hello you|9|1"},
      {"+= string", [](zxStr& s) { s += zxStr("ab"); }, "helloab|7|1"},
      {"at", [](zxStr& s) { s.at(0) = 'H'; }, "Hello|5|1"},
      {"at, reading", [](zxStr& s) { EXPECT_EQ(s.at(1), 'e'); }, "hello|5|1"},
      {"set_length down", [](zxStr& s) { s.set_length(2); }, "he|5|1"},
      {"set_length up", [](zxStr& s) { s.set_length(7); }, "hello\0\0|71|1"s},
      {"buffer", [](zxStr& s) { s.buffer(5)[0] = 'y'; }, "yello|5|1"},
      {"reserve", [](zxStr& s) { s.reserve(8); }, "hello|8|1"},
      {"unshare", [](zxStr& s) { s.unshare(); }, "hello|5|1"},
      {"clear", [](zxStr& s) { s.clear(); }, "|0|0"},
      {"to_upper", [](zxStr& s) { s.to_upper(); }, "HELLO|5|1"},
      {"= text", [](zxStr& s) { s = "new"; }, "new|3|1"},
      {"= longer text", [](zxStr& s) { s = "brand new"; }, "brand new|9|1"},
      {"= own part", [](zxStr& s) { s = s.c_str() + 2; }, "llo|3|1"},
      {"= byte", [](zxStr& s) { s = 'n'; }, "n|1|1"},
      {"= empty", [](zxStr& s) { s = zxStr(); }, "|0|0"},
      {"build", [](zxStr& s) { s.build("ab", 2, "c", 1); }, "abc|3|1"},
      {"build from own",
       [](zxStr& s) { s.build(s.c_str() + 1, 4, s.c_str(), 1); }, "elloh|5|1"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxStr s("hello");
    const zxStr copy = s;
    row.change(s);
    EXPECT_EQ(state_of(s), row.expected);
    EXPECT_EQ(state_of(copy), "hello|5|1");
    EXPECT_FALSE(share(s, copy));
  }
}

TEST(zxstr, what_changes_nothing_keeps_the_sharing) {
  const struct {
    const char* name;
    void (*use)(zxStr&);
  } rows[] = {
      {"set_length to the same", [](zxStr& s) { s.set_length(5); }},
      {"reserve within", [](zxStr& s) { s.reserve(5); }},
      {"reserve below the length", [](zxStr& s) { s.reserve(0); }},
      {"to_lower without a capital", [](zxStr& s) { s.to_lower(); }},
      {"assignment of itself", [](zxStr& s) { s = *&s; }},
      {"assignment of a sharer",
       [](zxStr& s) {
         const zxStr t = s;
         s = t;
       }},
      {"sync_length without a NUL", [](zxStr& s) { s.sync_length(); }},
      {"reading", [](zxStr& s) { EXPECT_EQ(s[0], 'h'); }},
      {"comparing", [](zxStr& s) { EXPECT_TRUE(s == "hello"); }},
      {"copying out",
       [](zxStr& s) {
         char out[6];
         s.copy_to(out, 6);
       }},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxStr s("hello");
    const zxStr copy = s;
    row.use(s);
    EXPECT_TRUE(share(s, copy));
    EXPECT_EQ(state_of(copy), "hello|5|2");
  }
}

TEST(zxstr, a_write_to_one_of_three_leaves_two_sharing) {
  zxStr a("hello");
  const zxStr b = a;
  const zxStr c = a;
  a.at(4) = '!';
  EXPECT_EQ(state_of(a), "hell!|5|1");
  EXPECT_TRUE(share(b, c));
  EXPECT_EQ(state_of(b), "hello|5|2");
}

TEST(zxstr, unsharing_leaves_the_spare_room_behind) {
  zxStr a("hello");
  a.append(" you");
  const zxStr b = a;
  a.unshare();
  EXPECT_EQ(state_of(a), "hello you|9|1");
  EXPECT_EQ(state_of(b), "hello you|73|1");
  a.unshare();
  EXPECT_EQ(state_of(a), "hello you|9|1");
}

TEST(zxstr, case_changes_unshare_only_for_a_letter_to_change) {
  zxStr a("ABC 1");
  const zxStr b = a;
  a.to_upper();
  EXPECT_TRUE(share(a, b));
  a.to_lower();
  EXPECT_EQ(state_of(a), "abc 1|5|1");
  EXPECT_EQ(state_of(b), "ABC 1|5|1");
}

// -------------------------------------------------------------- assigning --

TEST(zxstr, assignment_of_an_empty_string_clears) {
  SlotWatch slot;
  zxStr a("hello");
  slot.calls.clear();
  a = zxStr();
  EXPECT_TRUE(is_shared_empty(a));
  EXPECT_EQ(slot.calls, SlotWatch::Calls{"free"});

  // Also of one that has a block.
  zxStr empty("x");
  empty.set_length(0);
  a = "hello";
  a = empty;
  EXPECT_TRUE(is_shared_empty(a));
  const zxStr copy = empty;
  EXPECT_TRUE(is_shared_empty(copy));
}

TEST(zxstr, assignment_of_text_stays_in_the_block_if_it_fits) {
  SlotWatch slot;
  zxStr a("hello");
  slot.calls.clear();
  a = "hi";
  EXPECT_EQ(state_of(a), "hi|5|1");
  a = "";
  EXPECT_EQ(state_of(a), "|5|1");
  a = 'x';
  EXPECT_EQ(state_of(a), "x|5|1");
  a = "world";
  EXPECT_EQ(state_of(a), "world|5|1");
  EXPECT_EQ(slot.calls, SlotWatch::Calls());
  a = "worlds";  // exactly, without a margin
  EXPECT_EQ(state_of(a), "worlds|6|1");
  EXPECT_EQ(slot.calls, SlotWatch::Calls{"resize 22"});
}

TEST(zxstr, assignment_of_its_own_text_works_in_place) {
  zxStr a("hello");
  a = a.c_str();
  EXPECT_EQ(state_of(a), "hello|5|1");
  a = a.c_str() + 1;
  EXPECT_EQ(state_of(a), "ello|5|1");
  a = a.c_str() + 4;
  EXPECT_EQ(state_of(a), "|5|1");
}

TEST(zxstr, assignment_of_null_is_an_assertion) {
  const char* null = nullptr;
  zxStr a("hello");
  EXPECT_ASSERTION(a = null, "zxstr");
  kit::with_failures_dropped([&] { a = null; });
  EXPECT_EQ(state_of(a), "hello|5|1");
}

TEST(zxstr, a_move_takes_the_block_over) {
  SlotWatch slot;
  {
    zxStr a("hello");
    const zxStrRep* block = a.representation();
    slot.calls.clear();
    zxStr b = std::move(a);
    EXPECT_EQ(b.representation(), block);
    EXPECT_EQ(refs(b), 1);
    zxStr c;
    c = std::move(b);
    EXPECT_EQ(c.representation(), block);
    EXPECT_EQ(state_of(c), "hello|5|1");
    EXPECT_EQ(slot.calls, SlotWatch::Calls());

    // What was moved from is a string like any other.
    a.append("again");
    EXPECT_EQ(text_of(a), "again");
    b = c;
    EXPECT_TRUE(share(b, c));
  }
  EXPECT_EQ(std::count(slot.calls.begin(), slot.calls.end(), "free"), 2);
}

TEST(zxstr, a_move_between_sharers_loses_no_holder) {
  zxStr a("hello");
  zxStr b = a;
  const zxStr c = a;
  b = std::move(a);
  EXPECT_EQ(text_of(b), "hello");
  EXPECT_EQ(text_of(c), "hello");
  a = "x";
  EXPECT_EQ(text_of(b), "hello");
  EXPECT_EQ(state_of(c), "hello|5|2");
}

TEST(zxstr, a_move_of_empty_or_onto_itself_is_harmless) {
  zxStr a;
  zxStr b("hello");
  b = std::move(a);
  EXPECT_EQ(text_of(b), "");
  EXPECT_TRUE(is_shared_empty(a));
  zxStr c("hello");
  zxStr& same = c;
  c = std::move(same);
  EXPECT_EQ(state_of(c), "hello|5|1");
}

// --------------------------------------------------------------- building --

TEST(zxstr, build_takes_the_sum_unless_the_own_block_is_large_enough) {
  const struct {
    const char* name;
    zxStr (*before)();
    const char* a;
    std::int32_t a_length;
    const char* b;
    std::int32_t b_length;
    std::string expected;
    SlotWatch::Calls calls;
  } rows[] = {
      {"shared empty, one piece",
       [] { return zxStr(); },
       "abc",
       3,
       nullptr,
       0,
       "abc|3|1",
       {"new 19"}},
      {"shared empty, two pieces",
       [] { return zxStr(); },
       "abc",
       3,
       "de",
       2,
       "abcde|5|1",
       {"new 21"}},
      {"shared empty, nothing",
       [] { return zxStr(); },
       "",
       0,
       nullptr,
       0,
       "|0|1",
       {"new 16"}},
      {"own, large enough",
       [] { return zxStr("hello"); },
       "ab",
       2,
       "cd",
       2,
       "abcd|5|1",
       {}},
      {"own, just large enough",
       [] { return zxStr("hello"); },
       "abc",
       3,
       "de",
       2,
       "abcde|5|1",
       {}},
      {"own, too small",
       [] { return zxStr("hello"); },
       "abc",
       3,
       "def",
       3,
       "abcdef|6|1",
       {"resize 22"}},
      {"own, nothing",
       [] { return zxStr("hello"); },
       "x",
       0,
       "y",
       0,
       "|5|1",
       {}},
      {"NUL bytes",
       [] { return zxStr("hello"); },
       "\0a\0",
       3,
       "\0",
       1,
       "\0a\0\0|5|1"s,
       {}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxStr s = row.before();
    SlotWatch slot;
    s.build(row.a, row.a_length, row.b, row.b_length);
    EXPECT_EQ(state_of(s), row.expected);
    EXPECT_EQ(slot.calls, row.calls);
    EXPECT_EQ(s.c_str()[s.length()], '\0');
  }
}

TEST(zxstr, build_on_a_shared_block_takes_a_new_one_of_exactly_the_sum) {
  zxStr s("hello");
  s.append(" you");
  const zxStr copy = s;
  SlotWatch slot;
  s.build("ab", 2);
  EXPECT_EQ(state_of(s), "ab|2|1");
  EXPECT_EQ(state_of(copy), "hello you|73|1");
  EXPECT_EQ(slot.calls, SlotWatch::Calls{"new 18"});
}

TEST(zxstr, build_takes_pieces_of_the_string_itself) {
  for (const bool shared : {false, true}) {
    for (std::int32_t from = 0; from <= 5; ++from) {
      for (std::int32_t other = 0; other <= 5; ++other) {
        SCOPED_TRACE(std::to_string(from) + " " + std::to_string(other));
        zxStr s("hello");
        const zxStr copy = shared ? s : zxStr();
        s.build(s.c_str() + from, 5 - from, s.c_str() + other, 5 - other);
        EXPECT_EQ(text_of(s),
                  "hello"s.substr(static_cast<std::size_t>(from)) +
                      "hello"s.substr(static_cast<std::size_t>(other)));
        EXPECT_EQ(text_of(copy), shared ? "hello" : "");
      }
    }
  }
}

TEST(zxstr, build_refuses_null_pointers_and_bad_lengths) {
  const struct {
    const char* name;
    void (*call)(zxStr&);
  } rows[] = {
      {"null a", [](zxStr& s) { s.build(nullptr, 0); }},
      {"null a with a length", [](zxStr& s) { s.build(nullptr, 3); }},
      {"a length without b", [](zxStr& s) { s.build("a", 1, nullptr, 1); }},
      {"negative length of b without b",
       [](zxStr& s) { s.build("a", 1, nullptr, -1); }},
      {"negative length of a", [](zxStr& s) { s.build("a", -1); }},
      {"negative length of b", [](zxStr& s) { s.build("a", 1, "b", -1); }},
      {"lengths that balance", [](zxStr& s) { s.build("a", -1, "bc", 2); }},
      {"overflow by one", [](zxStr& s) { s.build("a", INT32_MAX, "b", 1); }},
      {"overflow to minus two",
       [](zxStr& s) { s.build("a", INT32_MAX, "b", INT32_MAX); }},
      {"overflow by the first",
       [](zxStr& s) { s.build("a", 1, "b", INT32_MAX); }},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxStr s("hello");
    const SlotWatch slot;
    EXPECT_ASSERTION(row.call(s), "zxstr");
    kit::with_failures_dropped([&] { row.call(s); });
    EXPECT_EQ(state_of(s), "hello|5|1");
    EXPECT_EQ(slot.calls, SlotWatch::Calls());
  }
}

// ---------------------------------------------------------- concatenation --

TEST(zxstr, concatenation_takes_exactly_the_sum) {
  const zxStr a("hello");
  const zxStr b(" you");
  EXPECT_EQ(state_of(a + b), "hello you|9|1");
  EXPECT_EQ(state_of(a + " you"), "hello you|9|1");
  EXPECT_EQ(state_of("hello" + b), "hello you|9|1");
  EXPECT_EQ(state_of(a + '!'), "hello!|6|1");
  EXPECT_EQ(state_of('!' + a), "!hello|6|1");
  EXPECT_EQ(state_of(a + '\0' + a), "hello\0hello|11|1"s);
  EXPECT_EQ(state_of(a + a), "hellohello|10|1");
  EXPECT_EQ(state_of(a), "hello|5|1");
}

TEST(zxstr, concatenation_with_an_empty_side_shares_the_other) {
  const zxStr a("hello");
  const zxStr none;
  EXPECT_TRUE(share(a + none, a));
  EXPECT_TRUE(share(none + a, a));
  EXPECT_TRUE(share(a + "", a));
  EXPECT_TRUE(share("" + a, a));
  EXPECT_EQ(text_of(none + none), "");
  EXPECT_EQ(text_of(none + ""), "");
  EXPECT_EQ(text_of("" + none), "");
  EXPECT_EQ(text_of(none + "abc"), "abc");
  EXPECT_EQ(text_of("abc" + none), "abc");
  EXPECT_EQ(refs(a), 1);
}

TEST(zxstr, concatenation_with_a_byte_never_shares) {
  EXPECT_EQ(state_of(zxStr() + 'a'), "a|1|1");
  EXPECT_EQ(state_of('a' + zxStr()), "a|1|1");
}

TEST(zxstr, concatenation_with_null_is_an_assertion) {
  const char* null = nullptr;
  const zxStr a("hello");
  EXPECT_ASSERTION(a + null, "zxstr");
  EXPECT_ASSERTION(null + a, "zxstr");
  kit::with_failures_dropped([&] {
    EXPECT_LE((a + null).length(), 5);
    EXPECT_LE((null + a).length(), 5);
  });
  EXPECT_EQ(state_of(a), "hello|5|1");
}

TEST(zxstr, chains_of_concatenations_take_exactly_the_sum) {
  const zxStr a("hello");
  const zxStr b(" you");
  EXPECT_EQ(state_of(a + b + a), "hello youhello|14|1");
  EXPECT_EQ(state_of(a + " my " + b + '!'), "hello my  you!|14|1");
  EXPECT_EQ(state_of('<' + (a + b) + '>'), "<hello you>|11|1");
  EXPECT_EQ(state_of("1" + a + "2" + b + "3"), "1hello2 you3|12|1");
  // What has spare room gives none of it on.
  zxStr roomy("hello");
  roomy.reserve(500);
  EXPECT_EQ(state_of(std::move(roomy) + b), "hello you|9|1");
  zxStr shared("hello");
  const zxStr sharer = shared;
  EXPECT_EQ(state_of(std::move(shared) + b), "hello you|9|1");
  EXPECT_EQ(text_of(sharer), "hello");
}

TEST(zxstr, a_chain_of_concatenations_leaves_no_block_behind) {
  SlotWatch slot;
  {
    const zxStr a("hello");
    const zxStr sum = a + " you" + '!' + a;
    EXPECT_EQ(text_of(sum), "hello you!hello");
  }
  EXPECT_EQ(std::count(slot.calls.begin(), slot.calls.end(), "free"),
            static_cast<std::ptrdiff_t>(slot.calls.size()) / 2);
}

TEST(zxstr, concatenation_leaves_a_given_up_side_usable) {
  const struct {
    const char* name;
    zxStr (*sum)(zxStr&);
    const char* expected;
  } rows[] = {
      {"string", [](zxStr& s) { return std::move(s) + zxStr("ab"); },
       "helloab"},
      {"text", [](zxStr& s) { return std::move(s) + "ab"; }, "helloab"},
      {"byte", [](zxStr& s) { return std::move(s) + 'a'; }, "helloa"},
      {"empty string", [](zxStr& s) { return std::move(s) + zxStr(); },
       "hello"},
      {"empty text", [](zxStr& s) { return std::move(s) + ""; }, "hello"},
      {"itself", [](zxStr& s) { return s + s; }, "hellohello"},
      {"itself given up", [](zxStr& s) { return std::move(s) + s; },
       "hellohello"},
      {"its own end", [](zxStr& s) { return std::move(s) + (s.c_str() + 1); },
       "helloello"},
      {"its own last byte", [](zxStr& s) { return std::move(s) + s[4]; },
       "helloo"},
      {"behind text", [](zxStr& s) { return "ab" + std::move(s); }, "abhello"},
      {"behind its own end",
       [](zxStr& s) { return (s.c_str() + 3) + std::move(s); }, "lohello"},
      {"behind a byte", [](zxStr& s) { return 'a' + std::move(s); }, "ahello"},
  };
  for (const auto& row : rows) {
    for (const std::int32_t room : {5, 6, 10, 200}) {
      for (const bool shared : {false, true}) {
        SCOPED_TRACE(row.name);
        zxStr s("hello");
        s.reserve(room);
        const zxStr sharer = shared ? s : zxStr();
        const zxStr sum = row.sum(s);
        EXPECT_EQ(text_of(sum), row.expected);
        if (sum.length() != 5) {
          EXPECT_EQ(state_of(sum),
                    row.expected + "|"s + std::to_string(sum.length()) + "|1");
        }
        EXPECT_EQ(text_of(sharer), shared ? "hello" : "");
        EXPECT_TRUE(text_of(s) == "hello" || is_shared_empty(s));
        s = "again";
        s += '!';
        EXPECT_EQ(text_of(s), "again!");
        EXPECT_EQ(text_of(sum), row.expected);
      }
    }
  }
}

TEST(zxstr, a_given_up_side_beside_an_empty_one_is_shared_or_taken) {
  SlotWatch slot;
  zxStr s("hello");
  const zxStrRep* block = s.representation();
  slot.calls.clear();
  const zxStr with_string = s + zxStr();
  const zxStr with_text = zxStr(with_string) + "";
  const zxStr behind = "" + zxStr(with_text);
  const zxStr last = std::move(s) + "";
  for (const zxStr* sum : {&with_string, &with_text, &behind, &last})
    EXPECT_EQ(sum->representation(), block);
  EXPECT_EQ(slot.calls, SlotWatch::Calls());
}

// -------------------------------------------------------------- comparing --

TEST(zxstr, equality_is_by_length_and_bytes) {
  const struct {
    std::string_view a;
    std::string_view b;
    bool equal;
  } rows[] = {
      {"", "", true},
      {"a", "a", true},
      {"a", "b", false},
      {"a", "", false},
      {"", "a", false},
      {"ab", "a", false},
      {"a", "ab", false},
      {"a\0b"sv, "a\0b"sv, true},
      {"a\0b"sv, "a\0c"sv, false},
      {"a\0"sv, "a", false},
      {"\0"sv, "", false},
      {"\xE0", "\xE0", true},
      {"\xE0", "`", false},
      {"Abc", "abc", false},
  };
  for (const auto& row : rows) {
    const zxStr a = str(row.a);
    const zxStr b = str(row.b);
    SCOPED_TRACE(std::string(row.a) + " " + std::string(row.b));
    EXPECT_EQ(a == b, row.equal);
    EXPECT_EQ(b == a, row.equal);
    EXPECT_EQ(a != b, !row.equal);
    // NUL-terminated text ends at its first NUL.
    const std::string_view text = row.b.substr(0, row.b.find('\0'));
    EXPECT_EQ(a == b.c_str(), row.a == text);
    EXPECT_TRUE(row.b.size() != 1 || (a == row.b[0]) == row.equal);
  }
  EXPECT_FALSE(zxStr("ab") == 'a');
  EXPECT_FALSE(zxStr() == 'a');
  EXPECT_FALSE(zxStr() == '\0');
  EXPECT_TRUE(zxStr('\0') == '\0');
}

TEST(zxstr, sharers_and_spare_room_compare_equal) {
  zxStr a("hello");
  const zxStr b = a;
  EXPECT_TRUE(a == b);
  a.reserve(500);
  EXPECT_TRUE(a == b);
}

TEST(zxstr, comparing_with_a_shorter_text_stays_within_it) {
  const zxStr a(std::string(10'000, 'x'));
  const auto heap_text = std::make_unique<char[]>(3);
  heap_text[0] = heap_text[1] = 'x';
  EXPECT_FALSE(a == heap_text.get());
}

// --------------------------------------------------------------- ordering --

// The order as the rule tells it.
std::strong_ordering slow_order(std::string_view a, std::string_view b) {
  for (std::size_t i = 0; i < a.size() && i < b.size(); ++i) {
    const int x = static_cast<unsigned char>(a[i]);
    const int y = static_cast<unsigned char>(b[i]);
    if (x != y)
      return x < y ? std::strong_ordering::less : std::strong_ordering::greater;
  }
  return a.size() <=> b.size();
}

TEST(zxstr, the_order_is_that_of_unsigned_bytes_and_then_of_lengths) {
  // In their order.
  constexpr std::string_view k_texts[] = {
      "",         "\0"sv,       "\0\0"sv, "\0a"sv, "\1",       " ",
      "A",        "B",          "a",      "a\0"sv, "a\0b"sv,   "a\0c"sv,
      "a\1",      "aa",         "aaa",    "ab",    "a\x7F",    "a\x80",
      "a\xFF",    "a\xFF\0"sv,  "b",      "z",     "\x7F",     "\x80",
      "\x80\x01", "\x80\x80",   "\xE0",   "\xFE",  "\xFF\0"sv, "\xFF\x7F",
      "\xFF\xFF", "\xFF\xFFzz",
  };
  for (std::size_t i = 0; i < std::size(k_texts); ++i) {
    for (std::size_t j = 0; j < std::size(k_texts); ++j) {
      SCOPED_TRACE(std::to_string(i) + " " + std::to_string(j));
      const zxStr a = str(k_texts[i]);
      const zxIStr b(k_texts[j].data(), zx_count(k_texts[j].size()));
      EXPECT_EQ(a <=> b, i <=> j);
      EXPECT_EQ(b <=> a, j <=> i);
      EXPECT_EQ(a < b, i < j);
      EXPECT_EQ(a <= b, i <= j);
      EXPECT_EQ(a > b, i > j);
      EXPECT_EQ(a >= b, i >= j);
      // Text ends at its first NUL.
      const std::string text(k_texts[j].substr(0, k_texts[j].find('\0')));
      EXPECT_EQ(a <=> text.c_str(), slow_order(k_texts[i], text));
      EXPECT_EQ(text.c_str() < a, slow_order(text, k_texts[i]) < 0);
    }
  }
  zxStr s("abc");
  const zxStr sharer = s;
  EXPECT_EQ(s <=> sharer, std::strong_ordering::equal);
  s.reserve(100);
  EXPECT_EQ(s <=> sharer, std::strong_ordering::equal);
}

TEST(zxstr, the_order_of_random_texts_is_that_of_the_slow_one) {
  constexpr unsigned k_seed = 815;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  const auto any = [&] {
    std::string text(random() % 40, 'a');
    if (!text.empty())
      for (int i = 0; i < 2; ++i)
        text[random() % text.size()] = static_cast<char>(random());
    return text;
  };
  for (int round = 0; round < 20'000; ++round) {
    const std::string a = any();
    const std::string b = any();
    ASSERT_EQ(str(a) <=> str(b), slow_order(a, b));
  }
}

TEST(zxstr, the_order_with_null_is_an_assertion) {
  const char* null = nullptr;
  const zxStr a("hello");
  EXPECT_ASSERTION(a <=> null, "zxstr");
  EXPECT_ASSERTION(a < null, "zxstr");
  EXPECT_ASSERTION(null < a, "zxstr");
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(a <=> null, std::strong_ordering::equal); });
}

TEST(zxstr, ordering_with_a_shorter_text_stays_within_it) {
  const auto text = std::make_unique<char[]>(3);
  text[0] = text[1] = 'x';
  EXPECT_TRUE(zxStr(std::string(10'000, 'x')) > text.get());
  EXPECT_TRUE(zxStr('x') < text.get());
}

TEST(zxstr, arrays_of_strings_are_sorted_by_the_standard) {
  constexpr unsigned k_seed = 99;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  zxQVA<zxStr> array;
  std::vector<std::string> model;
  for (int i = 0; i < 2000; ++i) {
    // Some several times, and sharing.
    if (i % 5 == 4) {
      array.append(array.get(i / 2));
      model.push_back(std::string(model[zx_size(i / 2)]));
      continue;
    }
    std::string text(random() % 6, '\0');
    for (char& byte : text) byte = static_cast<char>(random());
    array.append(str(text));
    model.push_back(text);
  }
  std::sort(array.begin(), array.end());
  std::sort(model.begin(), model.end(),
            [](const auto& a, const auto& b) { return slow_order(a, b) < 0; });
  for (std::int32_t i = 0; i < array.length(); ++i)
    ASSERT_EQ(text_of(array.get(i)), model[zx_size(i)]);
  EXPECT_TRUE(std::binary_search(array.begin(), array.end(), str(model[77])));
  std::ranges::sort(array, std::ranges::greater());
  for (std::int32_t i = 0; i < array.length(); ++i)
    ASSERT_EQ(text_of(array.from_top(i)), model[zx_size(i)]);
  std::int32_t holders = 0;
  for (const zxStr& s : array)
    if (!s.is_empty()) holders += share(s, array.get(0));
  EXPECT_EQ(holders, refs(array.get(0)));
}

// ---------------------------------------------------------------- reading --

TEST(zxstr, indexes_reach_the_characters_and_no_more) {
  zxStr s("a\0c"sv);
  EXPECT_EQ(s[0], 'a');
  EXPECT_EQ(s[1], '\0');
  EXPECT_EQ(s[2], 'c');
  for (const std::int32_t i : {-1, 3, 4, INT32_MAX, INT32_MIN}) {
    SCOPED_TRACE(i);
    EXPECT_ASSERTION(s[i], "zxstr");
    EXPECT_ASSERTION(s.at(i), "zxstr");
    kit::with_failures_dropped([&] {
      EXPECT_EQ(s[i], '\0');
      s.at(i) = 'x';
      EXPECT_EQ(s.at(i), '\0');
    });
    EXPECT_EQ(state_of(s), "a\0c|3|1"s);
  }
  EXPECT_ASSERTION(zxStr()[0], "zxstr");
}

TEST(zxstr, a_failed_at_keeps_the_sharing_and_the_empty_string) {
  zxStr s("hello");
  const zxStr copy = s;
  EXPECT_ASSERTION(s.at(5), "zxstr");
  EXPECT_TRUE(share(s, copy));
  zxStr none;
  kit::with_failures_dropped([&] { none.at(0) = 'x'; });
  EXPECT_STREQ(zxStr().c_str(), "");
  EXPECT_EQ(zx_empty_rep.data[0], '\0');
}

TEST(zxstr, a_view_has_the_characters) {
  const zxStr s("a\0c"sv);
  EXPECT_EQ(s.view(), "a\0c"sv);
  EXPECT_EQ(s.view().data(), s.c_str());
  EXPECT_EQ(zxStr().length(), 0);
}

// Takes any text.
std::size_t bytes_in(std::string_view text) { return text.size(); }

TEST(zxstr, a_string_is_a_view_and_a_view_makes_a_string) {
  const zxStr s("a\0c"sv);
  const zxIStr inner("a\0c", 3);
  const std::string_view view = s;
  EXPECT_EQ(view, "a\0c"sv);
  EXPECT_EQ(view.data(), s.c_str());
  EXPECT_EQ(std::string_view(inner).data(), inner.c_str());
  EXPECT_EQ(bytes_in(s), 3U);
  EXPECT_EQ(bytes_in(inner), 3U);
  EXPECT_EQ(std::string(s), "a\0c"s);
  EXPECT_EQ(state_of(zxStr(view)), "a\0c|3|1"s);
  EXPECT_EQ(state_of(zxStr(view.substr(1))), "\0c|2|1"s);
  EXPECT_FALSE(share(zxStr(s.view()), s));
  const zxStr none;
  EXPECT_TRUE(std::string_view(none).empty());
  EXPECT_NE(std::string_view(none).data(), nullptr);
  // A view becomes a string only when one says so, for that allocates.
  static_assert(std::is_constructible_v<zxStr, std::string_view>);
  static_assert(!std::is_convertible_v<std::string_view, zxStr>);
  static_assert(!std::is_convertible_v<char, zxStr>);
}

TEST(zxstr, the_characters_are_a_range) {
  const zxStr s("a\0c"sv);
  EXPECT_EQ(s.begin(), s.c_str());
  EXPECT_EQ(s.end() - s.begin(), 3);
  std::string seen;
  for (const char byte : s) seen += byte;
  EXPECT_EQ(seen, "a\0c"s);
  EXPECT_EQ(std::count(s.begin(), s.end(), '\0'), 1);
  EXPECT_EQ(std::ranges::find(s, 'c'), s.begin() + 2);
  zxIStr inner("hello");
  EXPECT_EQ(std::string(inner.begin(), inner.end()), "hello");
  inner += "!";
  EXPECT_EQ(inner.end()[-1], '!');
  const zxStr none;
  EXPECT_EQ(none.begin(), none.end());
  static_assert(std::ranges::contiguous_range<const zxStr&>);
}

template <class S>
concept has_view = requires(S&& s) {
  static_cast<S&&>(s).view();
};
template <class S>
concept has_begin = requires(S&& s) {
  static_cast<S&&>(s).begin();
};
template <class S>
concept has_end = requires(S&& s) {
  static_cast<S&&>(s).end();
};
template <class S>
concept becomes_view = std::is_convertible_v<S, std::string_view>;
template <class S>
concept gives_out =
    has_view<S> && has_begin<S> && has_end<S> && becomes_view<S>;
template <class S>
concept keeps_in =
    !has_view<S> && !has_begin<S> && !has_end<S> && !becomes_view<S>;

TEST(zxstr, a_temporary_gives_no_view) {
  static_assert(gives_out<zxStr&> && gives_out<const zxStr&>);
  static_assert(gives_out<zxIStr&> && gives_out<const zxIStr&>);
  static_assert(keeps_in<zxStr> && keeps_in<const zxStr>);
  static_assert(keeps_in<zxIStr> && keeps_in<const zxIStr>);
}

TEST(zxstr, copy_to_takes_characters_and_nul) {
  const zxStr s("a\0c"sv);
  char out[6] = {'#', '#', '#', '#', '#', '#'};
  s.copy_to(out, 4);
  EXPECT_EQ(std::string_view(out, 6), "a\0c\0##"sv);
  zxStr().copy_to(out, 1);
  EXPECT_EQ(std::string_view(out, 2), "\0\0"sv);
  s.copy_to(out, INT32_MAX);
  EXPECT_EQ(std::string_view(out, 6), "a\0c\0##"sv);
}

TEST(zxstr, copy_to_refuses_null_and_too_small_a_buffer) {
  const zxStr s("abc");
  char out[4] = "###";
  for (const std::int32_t size : {3, 2, 0, -1, INT32_MIN}) {
    EXPECT_ASSERTION(s.copy_to(out, size), "zxstr");
    kit::with_failures_dropped([&] { s.copy_to(out, size); });
  }
  EXPECT_STREQ(out, "###");
  EXPECT_ASSERTION(s.copy_to(nullptr, 100), "zxstr");
  EXPECT_ASSERTION(zxStr().copy_to(out, 0), "zxstr");
  kit::with_failures_dropped([&] { s.copy_to(nullptr, 100); });
}

// ----------------------------------------------------------------- growth --

// `count` bytes by single appends.
zxStr grown(std::int32_t count) {
  zxStr s;
  for (std::int32_t i = 0; i < count; ++i) s.append('x');
  return s;
}

TEST(zxstr, appending_a_byte_tests_the_old_length_and_grows_to_it_and_64) {
  const struct {
    std::int32_t count;
    std::int32_t capacity;
  } rows[] = {{1, 64},    {63, 64},   {64, 64},     {65, 128},
              {128, 128}, {129, 192}, {1000, 1024}, {1025, 1088}};
  for (const auto& row : rows)
    EXPECT_EQ(grown(row.count).capacity(), row.capacity) << row.count;
  zxStr s("hello");
  s.append('w');
  EXPECT_EQ(state_of(s), "hellow|69|1");
}

TEST(zxstr, appending_text_tests_the_new_length_and_grows_to_it_and_64) {
  const struct {
    const char* start;
    std::int32_t reserved;
    const char* text;
    std::int32_t capacity;
  } rows[] = {
      {"hello", 5, "w", 70},  // 6 is not below 5
      {"hello", 6, "w", 70},  // 6 is not below 6
      {"hello", 7, "w", 7},   // 6 is
      {"hello", 7, " you", 73}, {"hello", 100, " you", 100},
      {"hello", 5, "", 69},  // by the same rule
      {"hello", 6, "", 6},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.capacity);
    for (const bool as_string : {false, true}) {
      zxStr s(row.start);
      s.reserve(row.reserved);
      as_string ? s.append(zxStr(row.text)) : s.append(row.text);
      EXPECT_EQ(state_of(s), std::string(row.start) + row.text + "|" +
                                 std::to_string(row.capacity) + "|1");
    }
  }
  zxStr s;
  s.append("abc");
  EXPECT_EQ(state_of(s), "abc|67|1");
}

TEST(zxstr, appending_grows_by_reallocation) {
  zxStr s("hello");
  SlotWatch slot;
  s.append('w');                           // 69
  s.append(std::string(64, 'x').c_str());  // 6 + 64 + 64
  EXPECT_EQ(s.capacity(), 134);
  EXPECT_EQ(slot.calls, (SlotWatch::Calls{"resize 85", "resize 150"}));
}

TEST(zxstr, each_growth_of_a_large_string_adds_64) {
  zxStr s = str(std::string(10'000, 'x'));
  std::vector<std::int32_t> capacities;
  for (int i = 0; i < 200; ++i) {
    s.append('y');
    if (capacities.empty() || capacities.back() != s.capacity())
      capacities.push_back(s.capacity());
  }
  EXPECT_EQ(capacities,
            (std::vector<std::int32_t>{10'064, 10'128, 10'192, 10'256}));
}

TEST(zxstr, appended_bytes_may_be_nul) {
  zxStr s;
  s.append("a\0b", 3).append('\0').append(str("\0c"sv)).append("d\0e");
  EXPECT_EQ(text_of(s), "a\0b\0\0cd"s);
}

TEST(zxstr, a_string_appends_itself_with_and_without_moving) {
  for (const std::int32_t reserved : {5, 11, 100}) {
    for (const std::int32_t from : {0, 1, 3, 5}) {
      SCOPED_TRACE(std::to_string(reserved) + " " + std::to_string(from));
      zxStr whole("hello");
      whole.reserve(reserved);
      whole += whole;
      EXPECT_EQ(text_of(whole), "hellohello");
      zxStr part("hello");
      part.reserve(reserved);
      part += part.c_str() + from;
      EXPECT_EQ(text_of(part),
                "hello" + "hello"s.substr(static_cast<std::size_t>(from)));
      zxStr bytes("hello");
      bytes.reserve(reserved);
      bytes.append(bytes.c_str() + from, 5 - from);
      EXPECT_EQ(text_of(bytes), text_of(part));
    }
  }
  // Again and again, through many growths.
  zxStr s("ab");
  std::string model = "ab";
  for (int i = 0; i < 12; ++i) {
    s += s;
    model += model;
    ASSERT_EQ(text_of(s), model);
  }
}

TEST(zxstr, appending_null_or_a_bad_length_is_an_assertion) {
  const struct {
    const char* name;
    void (*call)(zxStr&);
  } rows[] = {
      {"null text",
       [](zxStr& s) { s.append(static_cast<const char*>(nullptr)); }},
      {"+= null", [](zxStr& s) { s += static_cast<const char*>(nullptr); }},
      {"null characters", [](zxStr& s) { s.append(nullptr, 0); }},
      {"negative length", [](zxStr& s) { s.append("a", -1); }},
      {"overflow", [](zxStr& s) { s.append("a", INT32_MAX); }},
      {"overflow with the margin",
       [](zxStr& s) { s.append("a", INT32_MAX - 63 - 5); }},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxStr s("hello");
    const SlotWatch slot;
    EXPECT_ASSERTION(row.call(s), "zxstr");
    kit::with_failures_dropped([&] { row.call(s); });
    EXPECT_EQ(state_of(s), "hello|5|1");
    EXPECT_EQ(slot.calls, SlotWatch::Calls());
  }
}

// ----------------------------------------------------------------- sizing --

TEST(zxstr, reserve_grows_to_exactly_n_and_never_shrinks) {
  zxStr s("hello");
  s.reserve(10);
  EXPECT_EQ(state_of(s), "hello|10|1");
  for (const std::int32_t n : {10, 9, 5, 4, 0}) {
    s.reserve(n);
    EXPECT_EQ(state_of(s), "hello|10|1") << n;
  }
  zxStr none;
  none.reserve(10);
  EXPECT_EQ(state_of(none), "|10|1");
  EXPECT_STREQ(none.c_str(), "");
}

TEST(zxstr, reserve_of_0_on_an_empty_string_gives_the_block_back) {
  SlotWatch slot;
  zxStr s("hello");
  s.set_length(0);
  slot.calls.clear();
  s.reserve(1);
  EXPECT_EQ(state_of(s), "|5|1");
  s.reserve(0);
  EXPECT_TRUE(is_shared_empty(s));
  EXPECT_EQ(slot.calls, SlotWatch::Calls{"free"});
}

TEST(zxstr, set_length_cuts_in_place_and_widens_with_nul) {
  zxStr s("hello");
  s.set_length(2);
  EXPECT_EQ(state_of(s), "he|5|1");
  s.set_length(4);  // no trace of what stood there
  EXPECT_EQ(state_of(s), "he\0\0|5|1"s);
  s.set_length(5);
  EXPECT_EQ(s.capacity(), 5);
  s.set_length(6);
  EXPECT_EQ(state_of(s), "he\0\0\0\0|70|1"s);
  s.set_length(70);
  EXPECT_EQ(s.capacity(), 70);
  s.set_length(71);
  EXPECT_EQ(s.capacity(), 135);
  s.set_length(0);
  EXPECT_EQ(state_of(s), "|135|1");
  zxStr none;
  none.set_length(3);
  EXPECT_EQ(state_of(none), "\0\0\0|67|1"s);
}

TEST(zxstr, sizes_that_are_negative_or_overflow_assert_before_allocating) {
  const struct {
    const char* name;
    void (*call)(zxStr&);
  } rows[] = {
      {"reserve", [](zxStr& s) { s.reserve(-1); }},
      {"reserve far", [](zxStr& s) { s.reserve(INT32_MIN); }},
      {"set_length", [](zxStr& s) { s.set_length(-1); }},
      {"set_length far", [](zxStr& s) { s.set_length(INT32_MIN); }},
      {"set_length, margin", [](zxStr& s) { s.set_length(0x7FFFFFF0); }},
      {"set_length, just", [](zxStr& s) { s.set_length(INT32_MAX - 63); }},
      {"set_length, most", [](zxStr& s) { s.set_length(INT32_MAX); }},
      {"buffer", [](zxStr& s) { s.buffer(-1); }},
      {"buffer, margin", [](zxStr& s) { s.buffer(0x7FFFFFF0); }},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxStr s("hello");
    const SlotWatch slot;
    EXPECT_ASSERTION(row.call(s), "zxstr");
    kit::with_failures_dropped([&] { row.call(s); });
    EXPECT_EQ(state_of(s), "hello|5|1");
    EXPECT_EQ(slot.calls, SlotWatch::Calls());
  }
}

// Stands in the slot and notes what is asked for, but has no memory.
std::size_t asked_for = 0;
void* no_memory(void*, std::size_t size) {
  asked_for = size;
  bail_code(2000);
  return nullptr;
}

TEST(zxstr, block_sizes_beyond_31_bits_are_right) {
  const zxReallocFunction old = zx_realloc;
  zxStr s("hello");
  zx_realloc = no_memory;
  EXPECT_FAILURE(s.reserve(INT32_MAX), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
  EXPECT_EQ(asked_for, 0x7FFFFFFFU + 16U);
  EXPECT_FAILURE(s.set_length(INT32_MAX - 64), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
  EXPECT_EQ(asked_for, 0x7FFFFFFFU + 16U);
  zx_realloc = old;
  EXPECT_EQ(state_of(s), "hello|5|1");
}

// A string of nearly 2^31 characters, most of which nobody ever touches.
class HugeText {
 public:
  explicit HugeText(std::int32_t length) {
    zx_realloc = [](void* block, std::size_t size) -> void* {
      if (size > PTRDIFF_MAX) return nullptr;
      if (block == nullptr) return std::calloc(size, 1);
      if (size == 0) {
        std::free(block);
        return nullptr;
      }
      return std::realloc(block, size);
    };
    void* probe = zx_realloc(nullptr, zx_size(length) + 16);
    exists = probe != nullptr;
    std::free(probe);
    if (!exists) return;
    text.reserve(length);
    const_cast<zxStrRep*>(text.representation())->length = length;
  }
  ~HugeText() {
    text.clear();
    zx_realloc = old;
  }
  HugeText(const HugeText&) = delete;
  HugeText& operator=(const HugeText&) = delete;

  bool exists;
  zxStr text;

 private:
  zxReallocFunction old = zx_realloc;
};

TEST(zxstr, lengths_at_the_end_of_31_bits_assert_and_change_nothing) {
  constexpr std::int32_t k_length = 0x7FFFFFF0;
  HugeText huge(k_length);
  if (!huge.exists) GTEST_SKIP() << "no 2 GiB in one piece here";
  const struct {
    const char* name;
    void (*call)(zxStr&);
  } rows[] = {
      {"byte, with the margin", [](zxStr& s) { s += 'x'; }},
      {"no text, with the margin", [](zxStr& s) { s += ""; }},
      {"text, with the margin", [](zxStr& s) { s += "x"; }},
      {"text, the sum", [](zxStr& s) { s += "0123456789abcdef"; }},
      {"string", [](zxStr& s) { s += zxStr("x"); }},
      {"itself", [](zxStr& s) { s += s; }},
      {"+ string", [](zxStr& s) { s + zxStr("0123456789abcdef"); }},
      {"+ itself", [](zxStr& s) { s + s; }},
      {"+ text", [](zxStr& s) { s + "0123456789abcdef"; }},
      {"text +", [](zxStr& s) { "0123456789abcdef" + s; }},
      {"string +", [](zxStr& s) { zxStr("0123456789abcdef") + s; }},
      {"build with itself",
       [](zxStr& s) { s.build(s.c_str(), s.length(), s.c_str(), 16); }},
      {"set_length", [](zxStr& s) { s.set_length(k_length + 1); }},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    EXPECT_ASSERTION(row.call(huge.text), "zxstr");
    kit::with_failures_dropped([&] { row.call(huge.text); });
    EXPECT_EQ(huge.text.length(), k_length);
    EXPECT_EQ(huge.text.capacity(), k_length);
    EXPECT_EQ(refs(huge.text), 1);
  }
}

TEST(zxstr, a_byte_beside_the_longest_string_is_an_assertion) {
  HugeText huge(INT32_MAX);
  if (!huge.exists) GTEST_SKIP() << "no 2 GiB in one piece here";
  EXPECT_ASSERTION(huge.text + 'x', "zxstr");
  EXPECT_ASSERTION('x' + huge.text, "zxstr");
  EXPECT_ASSERTION(huge.text += 'x', "zxstr");
  kit::with_failures_dropped([&] {
    EXPECT_TRUE((huge.text + 'x').is_empty());
    EXPECT_TRUE(('x' + huge.text).is_empty());
  });
  EXPECT_EQ(huge.text.length(), INT32_MAX);
}

TEST(zxstr, a_buffer_is_filled_and_its_length_synced) {
  zxStr s("hello");
  const zxStr copy = s;
  char* place = s.buffer(10);
  EXPECT_EQ(refs(s), 1);
  EXPECT_EQ(s.capacity(), 74);
  EXPECT_EQ(place, s.c_str());
  std::memcpy(place, "0123456789", 11);
  s.sync_length();
  EXPECT_EQ(text_of(s), "0123456789");
  std::memcpy(s.buffer(10), "abc", 4);
  s.sync_length();
  EXPECT_EQ(text_of(s), "abc");
  *s.buffer(10) = '\0';
  s.sync_length();
  EXPECT_EQ(state_of(s), "|74|1");
  EXPECT_EQ(text_of(copy), "hello");
}

TEST(zxstr, a_buffer_of_the_present_length_is_unshared) {
  zxStr s("hello");
  const zxStr copy = s;
  s.buffer(5)[0] = 'y';
  EXPECT_EQ(state_of(s), "yello|5|1");
  EXPECT_EQ(state_of(copy), "hello|5|1");
}

TEST(zxstr, sync_length_at_an_inner_nul_leaves_the_sharers) {
  zxStr s("a\0b"sv);
  const zxStr copy = s;
  s.sync_length();
  EXPECT_EQ(state_of(s), "a|3|1");
  EXPECT_EQ(state_of(copy), "a\0b|3|1"s);
}

TEST(zxstr, a_buffer_that_is_refused_is_null) {
  zxStr s("hello");
  zxIStr inner("hello");
  kit::with_failures_dropped([&] {
    for (const std::int32_t n : {-1, INT32_MIN, INT32_MAX, INT32_MAX - 63}) {
      EXPECT_EQ(s.buffer(n), nullptr);
      EXPECT_EQ(inner.buffer(n), nullptr);
    }
  });
  EXPECT_EQ(state_of(s), "hello|5|1");
  EXPECT_EQ(state_of(inner), "hello|100|0");
  EXPECT_EQ(s.buffer(5), s.c_str());
}

TEST(zxstr, sync_length_stops_at_the_end_of_the_block) {
  zxStr s;
  char* place = s.buffer(10);
  std::memset(place, 'x', zx_size(s.capacity()) + 1);
  EXPECT_ASSERTION(s.sync_length(), "zxstr");
  kit::with_failures_dropped([&] { s.sync_length(); });
  EXPECT_EQ(s.length(), 10);
  place[10] = '\0';
}

TEST(zxstr, clear_frees_the_block_of_a_single_holder) {
  SlotWatch slot;
  zxStr s("hello");
  slot.calls.clear();
  s.clear();
  EXPECT_TRUE(is_shared_empty(s));
  EXPECT_EQ(slot.calls, SlotWatch::Calls{"free"});
  s = "hello";
  const zxStr copy = s;
  slot.calls.clear();
  s.clear();
  EXPECT_TRUE(is_shared_empty(s));
  EXPECT_EQ(state_of(copy), "hello|5|1");
  EXPECT_EQ(slot.calls, SlotWatch::Calls());
}

// ---------------------------------------------------------------- letters --

TEST(zxstr, only_ascii_letters_change_their_case) {
  std::string all;
  for (int byte = 0; byte < 256; ++byte) all += static_cast<char>(byte);
  std::string upper = all;
  std::string lower = all;
  for (std::size_t i = 0; i < 26; ++i) {
    upper['a' + i] = static_cast<char>('A' + i);
    lower['A' + i] = static_cast<char>('a' + i);
  }
  zxStr s = str(all);
  s.to_upper();
  EXPECT_EQ(text_of(s), upper);
  s = str(all);
  s.to_lower();
  EXPECT_EQ(text_of(s), lower);
  zxStr none;
  none.to_upper();
  none.to_lower();
  EXPECT_TRUE(is_shared_empty(none));
}

// --------------------------------------------------------------- trimming --

TEST(zxstr, trim_removes_white_space_at_both_ends) {
  const struct {
    std::string_view text;
    std::string_view expected;
  } rows[] = {
      {"", ""},
      {"a", "a"},
      {" a", "a"},
      {"a ", "a"},
      {" a b ", "a b"},
      {"  a  b  ", "a  b"},
      {"\t\n\v\f\r a \r\f\v\n\t", "a"},
      {" ", ""},
      {" \t\r\n ", ""},
      {"\x08 a \x0E", "\x08 a \x0E"},
      {"\0 a \0"sv, "\0 a \0"sv},
      {" \0 "sv, "\0"sv},
      {"\xA0 a \x85", "\xA0 a \x85"},
      {" \xE0 ", "\xE0"},
  };
  for (const auto& row : rows) {
    zxStr s = str(row.text);
    trim(s);
    EXPECT_EQ(text_of(s), row.expected) << testing::PrintToString(row.text);
    EXPECT_EQ(s.c_str()[s.length()], '\0');
  }
}

TEST(zxstr, trim_knows_every_byte) {
  for (int byte = 0; byte < 256; ++byte) {
    const std::string c(1, static_cast<char>(byte));
    const bool is_space = byte == 32 || (byte >= 9 && byte <= 13);
    zxStr s = str(c + "x" + c);
    trim(s);
    EXPECT_EQ(text_of(s), is_space ? "x" : c + "x" + c) << byte;
  }
}

TEST(zxstr, trim_keeps_the_sharing_unless_there_is_something_to_remove) {
  zxStr s = str("a b");
  const zxStr sharer = s;
  trim(s);
  EXPECT_TRUE(share(s, sharer));
  zxStr wide = str(" a b\n");
  const zxStr kept = wide;
  trim(wide);
  EXPECT_EQ(text_of(wide), "a b");
  EXPECT_EQ(text_of(kept), " a b\n");
  EXPECT_EQ(refs(kept), 1);
}

TEST(zxstr, trim_of_white_space_alone_leaves_the_empty_string) {
  zxStr s = str(" \t ");
  const zxStr sharer = s;
  trim(s);
  EXPECT_TRUE(is_shared_empty(s));
  EXPECT_EQ(text_of(sharer), " \t ");
  trim(s);
  EXPECT_TRUE(is_shared_empty(s));
}

TEST(zxstr, trim_works_in_the_string_itself) {
  zxStr s = str(std::string(10, ' ') + std::string(500, 'x') + "y\n");
  const zxStrRep* const block = s.representation();
  trim(s);
  EXPECT_EQ(text_of(s), std::string(500, 'x') + "y");
  EXPECT_EQ(s.representation(), block);
  zxIStr inner(" inner ");
  trim(inner);
  EXPECT_EQ(text_of(inner), "inner");
}

TEST(zxstr, strip_line_end_removes_one_line_end) {
  const struct {
    std::string_view text;
    std::string_view expected;
  } rows[] = {
      {"", ""},
      {"a", "a"},
      {"a\n", "a"},
      {"a\r\n", "a"},
      {"a\r", "a\r"},
      {"a\n\r", "a\n\r"},
      {"a\n\n", "a\n"},
      {"a\r\n\r\n", "a\r\n"},
      {"a\r\r\n", "a\r"},
      {"a\n\r\n", "a\n"},
      {"a \n", "a "},
      {"\n", ""},
      {"\r\n", ""},
      {"\r", "\r"},
      {"a\nb", "a\nb"},
      {"a\n\0"sv, "a\n\0"sv},
      {"\0\r\n"sv, "\0"sv},
  };
  for (const auto& row : rows) {
    zxStr s = str(row.text);
    strip_line_end(s);
    EXPECT_EQ(text_of(s), row.expected) << testing::PrintToString(row.text);
    EXPECT_EQ(s.c_str()[s.length()], '\0');
    zxIStr inner(str(row.text));
    strip_line_end(inner);
    EXPECT_EQ(text_of(inner), row.expected);
  }
}

TEST(zxstr, strip_line_end_leaves_the_sharers_alone) {
  zxStr s = str("a\r\n");
  const zxStr sharer = s;
  strip_line_end(s);
  EXPECT_EQ(text_of(s), "a");
  EXPECT_EQ(text_of(sharer), "a\r\n");
  zxStr plain = str("a");
  const zxStr other = plain;
  strip_line_end(plain);
  EXPECT_TRUE(share(plain, other));
}

TEST(zxstr, strip_line_end_keeps_the_block) {
  zxStr s = str("line\n");
  const zxStrRep* const block = s.representation();
  strip_line_end(s);
  EXPECT_EQ(s.representation(), block);
}

// ---------------------------------------------------------------- numbers --

TEST(zxstr, to_int_reads_decimal_integers) {
  const struct {
    std::string_view text;
    std::int32_t value;
  } rows[] = {
      {"", 0},
      {" \t\r\n\v\f", 0},
      {"0", 0},
      {"7", 7},
      {"+7", 7},
      {"-7", -7},
      {"-0", 0},
      {"0007", 7},
      {" \t7\r\n", 7},
      {"  -12  ", -12},
      // Commas between digits, once the value is not 0.
      {"1,234", 1234},
      {"1,2,3", 123},
      {"-1,234,567", -1234567},
      {"01,000", 1000},
      {"12,3456", 123456},
      {"0,5", 0},
      {"00,1", 0},
      {",1", 0},
      {"1,", 0},
      {"1,,2", 0},
      {"-,1", 0},
      {"1, 2", 0},
      {"1,k", 0},
      // The last character multiplies.
      {"5k", 5000},
      {"5K", 5000},
      {"5m", 5000000},
      {"5M", 5000000},
      {"-5k", -5000},
      {"1,000k", 1000000},
      {" 2m ", 2000000},
      {"0k", 0},
      {"k", 0},
      {"-k", 0},
      {"+", 0},
      {"-", 0},
      {"5kk", 0},
      {"5km", 0},
      {"5 k", 0},
      {"k5", 0},
      {"5g", 0},
      // Anything else.
      {"abc", 0},
      {"12a", 0},
      {"a12", 0},
      {"1 2", 0},
      {"12.5", 0},
      {"12.", 0},
      {"1e3", 0},
      {"0x10", 0},
      {"+-1", 0},
      {"--1", 0},
      {"- 1", 0},
      {"1-", 0},
      {"1\0"sv, 0},
      {"\0001"sv, 0},
      {"1\0002"sv, 0},
      {"\xA0"
       "5",
       0},
      {"\xB2", 0},
      {"\xE0", 0},
      // The bounds of 32 bits, the same with either sign.
      {"2147483647", 2147483647},
      {"-2147483647", -2147483647},
      {"2,147,483,647", 2147483647},
      {"0000000000000000000002147483647", 2147483647},
      {"2147483648", 0},
      {"-2147483648", 0},
      {"-2147483649", 0},
      {"4294967297", 0},
      {"9999999999", 0},
      {"99999999999", 0},
      {"18446744073709551617", 0},
      {"99999999999999999999999999999999", 0},
      {"2147483k", 2147483000},
      {"-2147483k", -2147483000},
      {"2147484k", 0},
      {"-2147484k", 0},
      {"3000000k", 0},
      {"2147m", 2147000000},
      {"2148m", 0},
      {"-2148m", 0},
      {"2147483647k", 0},
      {"2147483647m", 0},
      {"4294967297m", 0},
      {"18446744073710k", 0},
      {"18446744073709552000m", 0},
  };
  for (const auto& row : rows)
    EXPECT_EQ(str(row.text).to_int(), row.value) << "'" << row.text << "'";
}

// The same rule in another way: cut off the ends, split at the commas, look
// at each piece.
std::int32_t model_to_int(std::string text) {
  constexpr char k_white[] = " \t\n\v\f\r";
  text.erase(0, text.find_first_not_of(k_white));
  text.erase(text.find_last_not_of(k_white) + 1);
  if (text.empty()) return 0;
  const bool negative = text[0] == '-';
  if (text[0] == '-' || text[0] == '+') text.erase(0, 1);
  long double factor = 1;
  if (!text.empty() && std::strchr("kK", text.back())) factor = 1e3L;
  if (!text.empty() && std::strchr("mM", text.back())) factor = 1e6L;
  if (factor > 1) text.pop_back();
  std::string digits;
  for (std::size_t at = 0; at <= text.size();) {
    const std::size_t end = std::min(text.find(',', at), text.size());
    const std::string piece = text.substr(at, end - at);
    if (piece.empty() ||
        piece.find_first_not_of("0123456789") != std::string::npos)
      return 0;
    if (at > 0 && digits.find_first_not_of('0') == std::string::npos) return 0;
    digits += piece;
    at = end + 1;
  }
  const long double value = std::stold(digits) * factor;
  if (value > 2147483647.0L) return 0;
  const auto whole = static_cast<std::int32_t>(value);
  return negative ? -whole : whole;
}

TEST(zxstr, to_int_agrees_with_a_slow_model) {
  constexpr unsigned k_seed = 20211121;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  constexpr std::string_view k_alphabet = "0123456789990,,+- kKmM\t.";
  int not_zero = 0;
  for (int round = 0; round < 200'000; ++round) {
    std::string text;
    for (auto left = random() % 12; left > 0; --left) {
      // Mostly digits, so that most texts are numbers.
      const auto most = random() % 4 == 0 ? k_alphabet.size() : 12;
      text += k_alphabet[random() % most];
    }
    const std::int32_t expected = model_to_int(text);
    not_zero += expected != 0;
    ASSERT_EQ(str(text).to_int(), expected) << "'" << text << "'";
  }
  EXPECT_GT(not_zero, 20'000);
}

// ------------------------------------------------ strings with room inside --

// True if the characters lie in the object itself.
template <class S>
bool is_inside(const S& s) {
  const auto object = reinterpret_cast<std::uintptr_t>(&s);
  const auto rep = reinterpret_cast<std::uintptr_t>(s.representation());
  return rep >= object && rep < object + sizeof s;
}

// A text of that length that tells its places apart.
std::string text_of_length(std::int32_t length) {
  std::string text;
  for (std::int32_t i = 0; i < length; ++i)
    text += static_cast<char>('a' + i % 26);
  return text;
}

TEST(zxstr, the_inner_room_follows_the_pointer_in_the_object) {
  const zxIStr s;
  unsigned char object[sizeof s];
  std::memcpy(object, static_cast<const void*>(&s), sizeof s);
  const void* pointer;
  std::int32_t counts[3];
  std::memcpy(&pointer, object, sizeof pointer);
  std::memcpy(counts, object + sizeof pointer, sizeof counts);
  EXPECT_EQ(pointer, reinterpret_cast<const char*>(&s) + sizeof pointer);
  EXPECT_EQ(counts[0], 100);  // capacity
  EXPECT_EQ(counts[1], 0);    // refs
  EXPECT_EQ(counts[2], 0);    // length
  EXPECT_EQ(object[sizeof pointer + sizeof counts], '\0');
  // The pointer, three counts, 100 characters and the NUL, up to a multiple
  // of the pointer.
  static_assert(sizeof(zxIStr) == (sizeof(void*) == 8 ? 128 : 120));
  static_assert(zxIStr::k_room == 100);
  static_assert(!zx_relocatable<zxIStr>);
  static_assert(zx_relocatable<zxStr>);
}

TEST(zxstr, inner_constructors_stay_inside_up_to_100_characters) {
  for (const std::int32_t length : {0, 1, 99, 100, 101, 300}) {
    SCOPED_TRACE(length);
    const std::string text = text_of_length(length);
    const bool fits = length <= 100;
    const std::string state =
        text + (fits ? "|100|0" : "|" + std::to_string(length) + "|1");
    const zxIStr from_text(text.c_str());
    const zxIStr from_characters(text.data(), length);
    const zxIStr from_temporary{str(text)};
    for (const zxIStr* s : {&from_text, &from_characters, &from_temporary}) {
      EXPECT_EQ(state_of(*s), state);
      EXPECT_EQ(is_inside(*s), fits);
      EXPECT_EQ(s->c_str()[length], '\0');
    }
    // A string beyond the room is shared as by any string.
    const zxStr plain = str(text);
    const zxIStr from_string(plain);
    EXPECT_EQ(is_inside(from_string), fits);
    EXPECT_EQ(share(from_string, plain), !fits);
    EXPECT_EQ(text_of(from_string), text);
    EXPECT_EQ(refs(plain), fits ? 1 : 2);
  }
  EXPECT_EQ(state_of(zxIStr("a\0b", 3)), "a\0b|100|0"s);
  EXPECT_EQ(state_of(zxIStr("abc", 0)), "|100|0");
}

TEST(zxstr, inner_constructors_refuse_null_and_negative_lengths) {
  const char* null = nullptr;
  EXPECT_ASSERTION(zxIStr(null), "zxstr");
  EXPECT_ASSERTION(zxIStr(null, 0), "zxstr");
  EXPECT_ASSERTION(zxIStr(null, 200), "zxstr");
  EXPECT_ASSERTION(zxIStr("abc", -1), "zxstr");
  EXPECT_ASSERTION(zxIStr("abc", INT32_MIN), "zxstr");
  kit::with_failures_dropped([&] {
    zxIStr a(null);
    zxIStr b(null, 200);
    zxIStr c("abc", -1);
    for (zxIStr* s : {&a, &b, &c}) {
      EXPECT_EQ(state_of(*s), "|100|0");
      EXPECT_TRUE(is_inside(*s));
      s->append("abc");
      EXPECT_EQ(state_of(*s), "abc|100|0");
    }
  });
}

enum class Way { copy_made, move_made, copied, moved };
constexpr Way k_ways[] = {Way::copy_made, Way::move_made, Way::copied,
                          Way::moved};

// What a string of `To` holds, and where, after it has been made from or
// assigned one of `From`.  `old_length` is its length ahead of an assignment.
template <class To, class From>
void expect_taken(Way way, std::int32_t length, std::int32_t old_length) {
  SCOPED_TRACE("way " + std::to_string(static_cast<int>(way)) + ", " +
               std::to_string(length) + " over " + std::to_string(old_length));
  const std::string text = text_of_length(length);
  auto from = std::make_unique<From>(text.data(), length);
  const bool from_inside = is_inside(*from);
  const zxStrRep* block = from->representation();
  auto to = [&] {
    if (way == Way::copy_made) return std::make_unique<To>(*from);
    if (way == Way::move_made) return std::make_unique<To>(std::move(*from));
    auto old =
        std::make_unique<To>(std::string(old_length, '-').data(), old_length);
    if (way == Way::copied) *old = *from;
    if (way == Way::moved) *old = std::move(*from);
    return old;
  }();

  // Only the own room holds a short text; an ordinary string, and one that
  // has left its room, never returns to it.
  const bool has_room = std::is_same_v<To, zxIStr> && old_length <= 100;
  const bool inside = has_room && length <= 100;
  EXPECT_EQ(is_inside(*to), inside);
  EXPECT_EQ(text_of(*to), text);
  EXPECT_EQ(to->c_str()[length], '\0');
  if (inside) {
    EXPECT_EQ(state_of(*to), text + "|100|0");
  } else if (length == 0) {
    EXPECT_TRUE(is_shared_empty(*to));
  } else if (from_inside) {
    // Copied, into the old block where that is large enough.
    const bool assigned = way == Way::copied || way == Way::moved;
    const std::int32_t old_room = assigned && !has_room ? old_length : 0;
    EXPECT_EQ(state_of(*to),
              text + "|" + std::to_string(std::max(length, old_room)) + "|1");
  } else {
    EXPECT_EQ(to->representation(), block);  // shared or taken over
  }

  // The source has its text still, or nothing; its room stays its own.
  if (from_inside) {
    EXPECT_EQ(from->representation(), block);
  }
  const bool kept = text_of(*from) == text;
  EXPECT_TRUE(kept || (is_shared_empty(*from) && way != Way::copy_made &&
                       way != Way::copied));
  if (!inside && length > 0 && !from_inside) {
    EXPECT_EQ(refs(*to), kept ? 2 : 1);
  }

  // Both live on by themselves.
  *from += "from";
  EXPECT_EQ(text_of(*to), text);
  *to += "to";
  EXPECT_EQ(text_of(*from), (kept ? text : "") + "from");
  from.reset();
  EXPECT_EQ(text_of(*to), text + "to");
}

TEST(zxstr, the_inner_room_is_never_shared_taken_or_left_dangling) {
  constexpr std::int32_t k_lengths[] = {0, 1, 99, 100, 101, 300};
  for (const Way way : k_ways) {
    for (const std::int32_t length : k_lengths) {
      const bool assigned = way == Way::copied || way == Way::moved;
      for (const std::int32_t old_length : k_lengths) {
        if (!assigned && old_length != 0) continue;
        expect_taken<zxIStr, zxIStr>(way, length, old_length);
        expect_taken<zxIStr, zxStr>(way, length, old_length);
        expect_taken<zxStr, zxIStr>(way, length, old_length);
        expect_taken<zxStr, zxStr>(way, length, old_length);
      }
    }
  }
}

TEST(zxstr, appended_bytes_fill_the_inner_room_and_then_take_64_more) {
  zxIStr s;
  std::string text;
  for (int i = 0; i < 100; ++i) {
    s += 'x';
    text += 'x';
    ASSERT_TRUE(is_inside(s)) << i;
  }
  EXPECT_EQ(state_of(s), text + "|100|0");
  s += 'y';
  EXPECT_FALSE(is_inside(s));
  EXPECT_EQ(state_of(s), text + "y|164|1");
}

TEST(zxstr, appended_text_stays_inside_up_to_a_length_of_99) {
  const struct {
    std::int32_t before;
    std::int32_t added;
    std::int32_t capacity;
  } rows[] = {{0, 99, 100},  {50, 49, 100}, {98, 1, 100},  {99, 0, 100},
              {0, 100, 164}, {50, 50, 164}, {99, 1, 164},  {100, 0, 164},
              {0, 101, 165}, {99, 2, 165},  {100, 1, 165}, {100, 300, 464}};
  for (const auto& row : rows) {
    SCOPED_TRACE(std::to_string(row.before) + " " + std::to_string(row.added));
    const std::string before = text_of_length(row.before);
    const std::string added = text_of_length(row.added);
    zxIStr by_text(before.data(), row.before);
    zxIStr by_bytes(by_text);
    zxIStr by_string(by_text);
    by_text += added.c_str();
    by_bytes.append(added.data(), row.added);
    by_string += str(added);
    for (const zxIStr* s : {&by_text, &by_bytes, &by_string}) {
      EXPECT_EQ(is_inside(*s), row.capacity == 100);
      EXPECT_EQ(state_of(*s), before + added + "|" +
                                  std::to_string(row.capacity) +
                                  (row.capacity == 100 ? "|0" : "|1"));
    }
  }
}

TEST(zxstr, an_inner_string_appends_and_assigns_parts_of_itself) {
  for (const std::int32_t length : {0, 10, 49, 50, 51, 100}) {
    for (const std::int32_t from : {0, 7, 50, 100}) {
      if (from > length) continue;
      SCOPED_TRACE(std::to_string(length) + " " + std::to_string(from));
      const std::string text = text_of_length(length);
      const std::string part = text.substr(zx_size(from));
      zxIStr whole(text.c_str());
      whole += whole;
      EXPECT_EQ(text_of(whole), text + text);
      zxIStr appended(text.c_str());
      appended += appended.c_str() + from;
      EXPECT_EQ(text_of(appended), text + part);
      zxIStr assigned(text.c_str());
      assigned = assigned.c_str() + from;
      EXPECT_EQ(text_of(assigned), part);
      zxIStr built(text.c_str());
      built.build(built.c_str() + from, length - from, built.c_str(), length);
      EXPECT_EQ(text_of(built), part + text);
    }
  }
}

TEST(zxstr, assigned_text_and_bytes_leave_the_inner_room) {
  const struct {
    const char* name;
    void (*assign)(zxIStr&);
    std::string expected;
  } rows[] = {
      {"text", [](zxIStr& s) { s = "new"; }, "new|3|1"},
      {"empty text", [](zxIStr& s) { s = ""; }, "|0|1"},
      {"byte", [](zxIStr& s) { s = 'n'; }, "n|1|1"},
      {"build", [](zxIStr& s) { s.build("ab", 2, "c", 1); }, "abc|3|1"},
      {"100 characters", [](zxIStr& s) { s = text_of_length(100).c_str(); },
       text_of_length(100) + "|100|1"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxIStr s("hello");
    row.assign(s);
    EXPECT_EQ(state_of(s), row.expected);
    EXPECT_FALSE(is_inside(s));
    // An ordinary string from then on.
    const zxStr copy = s;
    EXPECT_EQ(share(s, copy), !s.is_empty());
    s.clear();
    EXPECT_TRUE(is_shared_empty(s));
  }
}

TEST(zxstr, an_assigned_empty_string_keeps_the_inner_room) {
  const zxStr none;
  const zxIStr inner_none;
  zxStr emptied("x");
  emptied.set_length(0);
  for (const zxStr* empty : {&none, static_cast<const zxStr*>(&inner_none),
                             static_cast<const zxStr*>(&emptied)}) {
    zxIStr s("hello");
    s = *empty;
    EXPECT_EQ(state_of(s), "|100|0");
    EXPECT_TRUE(is_inside(s));
    EXPECT_STREQ(s.c_str(), "");
  }
  zxIStr s("hello");
  s = zxStr();
  EXPECT_TRUE(is_inside(s));
  s.append("again");
  EXPECT_EQ(state_of(s), "again|100|0");
}

TEST(zxstr, a_grown_inner_string_is_shared_by_assignment) {
  zxIStr s(text_of_length(99).c_str());
  s += "and more";
  ASSERT_FALSE(is_inside(s));
  zxStr plain;
  plain = s;
  EXPECT_TRUE(share(plain, s));
  EXPECT_EQ(state_of(plain), text_of_length(99) + "and more|171|2");
  zxIStr other;
  other = s;
  EXPECT_TRUE(share(other, s));
  EXPECT_EQ(refs(s), 3);
  s.at(0) = 'A';
  EXPECT_EQ(plain[0], 'a');
  EXPECT_TRUE(share(plain, other));
}

TEST(zxstr, operations_on_an_inner_string_work_in_its_room) {
  const struct {
    const char* name;
    void (*change)(zxIStr&);
    std::string expected;
  } rows[] = {
      {"to_upper", [](zxIStr& s) { s.to_upper(); }, "HELLO|100|0"},
      {"to_lower", [](zxIStr& s) { s.to_lower(); }, "hello|100|0"},
      {"at", [](zxIStr& s) { s.at(4) = '!'; }, "hell!|100|0"},
      {"unshare", [](zxIStr& s) { s.unshare(); }, "hello|100|0"},
      {"clear", [](zxIStr& s) { s.clear(); }, "|100|0"},
      {"set_length to the same", [](zxIStr& s) { s.set_length(5); },
       "hello|100|0"},
      {"set_length down", [](zxIStr& s) { s.set_length(2); }, "he|100|0"},
      {"set_length to none", [](zxIStr& s) { s.set_length(0); }, "|100|0"},
      {"set_length down and up",
       [](zxIStr& s) {
         s.set_length(1);
         s.set_length(3);
       },
       "h\0\0|100|0"s},
      {"set_length, just", [](zxIStr& s) { s.set_length(100); },
       "hello" + std::string(95, '\0') + "|100|0"},
      {"set_length beyond", [](zxIStr& s) { s.set_length(101); },
       "hello" + std::string(96, '\0') + "|165|1"},
      {"reserve within", [](zxIStr& s) { s.reserve(100); }, "hello|100|0"},
      {"reserve of none", [](zxIStr& s) { s.reserve(0); }, "hello|100|0"},
      {"reserve beyond", [](zxIStr& s) { s.reserve(101); }, "hello|101|1"},
      {"buffer within", [](zxIStr& s) { s.buffer(100)[99] = '!'; },
       "hello" + std::string(94, '\0') + "!|100|0"},
      {"buffer beyond", [](zxIStr& s) { s.buffer(101)[100] = '!'; },
       "hello" + std::string(95, '\0') + "!|165|1"},
      {"sync_length",
       [](zxIStr& s) {
         std::memcpy(s.buffer(50), "by a caller", 12);
         s.sync_length();
       },
       "by a caller|100|0"},
      {"sync_length to none",
       [](zxIStr& s) {
         *s.buffer(100) = '\0';
         s.sync_length();
       },
       "|100|0"},
      {"assignment of itself", [](zxIStr& s) { s = *&s; }, "hello|100|0"},
      {"a short string", [](zxIStr& s) { s = zxStr("short"); }, "short|100|0"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxIStr s("hello");
    row.change(s);
    EXPECT_EQ(state_of(s), row.expected);
    EXPECT_EQ(is_inside(s), row.expected.ends_with("|0"));
    EXPECT_EQ(s.c_str()[s.length()], '\0');
  }
  zxIStr none;
  none.reserve(0);
  EXPECT_EQ(state_of(none), "|100|0");
}

TEST(zxstr, an_emptied_inner_string_that_has_grown_is_an_ordinary_one) {
  zxIStr s(text_of_length(101).c_str());
  s.clear();
  EXPECT_TRUE(is_shared_empty(s));
  const zxStr plain("hello");
  s = plain;
  EXPECT_TRUE(share(s, plain));
}

TEST(zxstr, an_inner_string_allocates_nothing_while_it_stays_inside) {
  const SlotWatch slot;
  const std::string most = text_of_length(100);
  zxIStr s;
  for (int i = 0; i < 100; ++i) s += 'x';
  s.clear();
  s.append(most.data(), 99);
  zxIStr copy(s);
  zxIStr moved(std::move(copy));
  copy = moved;
  copy = std::move(moved);
  copy = zxIStr(most.c_str());
  copy = zxStr();
  copy += "some";
  copy.set_length(100);
  copy.buffer(50)[3] = '\0';
  copy.sync_length();
  copy.reserve(100);
  copy.at(1) = 'A';
  copy.to_lower();
  copy.unshare();
  copy.append(copy);
  std::swap(s, copy);
  EXPECT_FALSE(s == copy);
  EXPECT_TRUE(s < copy || copy < s);
  char out[101];
  copy.copy_to(out, 101);
  EXPECT_TRUE(is_inside(s) && is_inside(copy) && is_inside(moved));
  EXPECT_EQ(slot.calls, SlotWatch::Calls());
}

TEST(zxstr, an_inner_string_returns_no_more_than_it_took) {
  SlotWatch slot;
  {
    zxIStr s(text_of_length(99).c_str());
    s += 'x';
    s += 'y';  // 101: one block
    s.append(text_of_length(70).c_str());
    zxIStr given(std::move(s));
    const zxStr copy = given;
    s = "more";
  }
  const auto count = [&](std::string_view start) {
    return std::count_if(
        slot.calls.begin(), slot.calls.end(),
        [&](const std::string& call) { return call.starts_with(start); });
  };
  EXPECT_EQ(count("new"), 2);
  EXPECT_EQ(count("free"), 2);
}

// Takes by value what it is given, and keeps it beyond the caller's.
zxStr upper_of(zxStr text) {
  text.to_upper();
  return text;
}

zxStr from_a_work_string(std::int32_t length) {
  zxIStr work;
  for (std::int32_t i = 0; i < length; ++i) work += 'w';
  return work;
}

zxIStr a_work_string(std::int32_t length) {
  zxIStr work;
  for (std::int32_t i = 0; i < length; ++i) work += 'w';
  return work;
}

TEST(zxstr, inner_strings_pass_by_value) {
  for (const std::int32_t length : {0, 5, 100, 101, 300}) {
    SCOPED_TRACE(length);
    const std::string text = text_of_length(length);
    std::string upper = text;
    for (char& byte : upper) byte = zx_upper(byte);
    zxIStr s(text.c_str());
    EXPECT_EQ(text_of(upper_of(s)), upper);
    EXPECT_EQ(text_of(s), text);
    EXPECT_EQ(is_inside(s), length <= 100);
    EXPECT_EQ(text_of(upper_of(std::move(s))), upper);
    EXPECT_TRUE(text_of(s) == text || is_shared_empty(s));

    const std::string work(zx_size(length), 'w');
    const zxStr plain = from_a_work_string(length);
    EXPECT_EQ(text_of(plain), work);
    EXPECT_EQ(refs(plain), length == 0 ? 0 : 1);
    const zxIStr returned = a_work_string(length);
    EXPECT_EQ(text_of(returned), work);
    EXPECT_EQ(is_inside(returned), length <= 100);
  }
}

TEST(zxstr, inner_strings_swap_with_all_strings) {
  constexpr std::int32_t k_lengths[] = {0, 5, 100, 101, 300};
  for (const std::int32_t m : k_lengths) {
    for (const std::int32_t n : k_lengths) {
      SCOPED_TRACE(std::to_string(m) + " " + std::to_string(n));
      const std::string a(zx_size(m), 'a');
      const std::string b(zx_size(n), 'b');
      zxIStr inner_a(a.c_str());
      zxIStr inner_b(b.c_str());
      std::swap(inner_a, inner_b);
      EXPECT_EQ(text_of(inner_a), b);
      EXPECT_EQ(text_of(inner_b), a);
      zxStr plain(a.c_str());
      std::swap<zxStr>(plain, inner_a);
      EXPECT_EQ(text_of(plain), b);
      EXPECT_EQ(text_of(inner_a), a);
      EXPECT_FALSE(share(plain, inner_a));
      std::swap<zxStr>(inner_b, plain);
      EXPECT_EQ(text_of(plain), a);
      EXPECT_EQ(text_of(inner_b), b);
    }
  }
}

TEST(zxstr, an_inner_string_moved_onto_itself_stays) {
  for (const std::int32_t length : {0, 5, 100, 101}) {
    const std::string text = text_of_length(length);
    zxIStr s(text.c_str());
    zxIStr& same = s;
    s = std::move(same);
    EXPECT_EQ(text_of(s), text);
    EXPECT_EQ(is_inside(s), length <= 100);
    zxStr& as_string = s;
    as_string = std::move(static_cast<zxStr&>(same));
    EXPECT_EQ(text_of(s), text);
    EXPECT_EQ(is_inside(s), length <= 100);
  }
}

TEST(zxstr, inner_strings_are_concatenated_and_compared_as_strings) {
  const zxIStr a("hello");
  const zxIStr none;
  EXPECT_EQ(state_of(a + " you"), "hello you|9|1");
  EXPECT_EQ(state_of("you " + a), "you hello|9|1");
  EXPECT_EQ(state_of(a + a), "hellohello|10|1");
  EXPECT_EQ(state_of(a + '!'), "hello!|6|1");
  // What would be shared is copied.
  EXPECT_EQ(state_of(a + none), "hello|5|1");
  EXPECT_EQ(state_of(none + a), "hello|5|1");
  EXPECT_EQ(state_of(a + ""), "hello|5|1");
  EXPECT_TRUE(is_shared_empty(none + none));
  EXPECT_EQ(state_of(zxIStr("hello") + " you"), "hello you|9|1");
  EXPECT_EQ(state_of(zxIStr("hello") + ""), "hello|5|1");
  EXPECT_TRUE(a == zxStr("hello"));
  EXPECT_TRUE(zxStr("hello") == a);
  EXPECT_TRUE(a == zxIStr("hello"));
  EXPECT_TRUE(a == "hello");
  EXPECT_FALSE(a == none);
  EXPECT_TRUE(none < a);
}

// ------------------------------------------------- corrupt representation --

struct Operation {
  const char* name;
  void (*call)(zxStr&);
};

// Every operation that first checks the string.
const Operation k_checked_operations[] = {
    {"copy", [](zxStr& s) { const zxStr copy(s); }},
    {"assign to another",
     [](zxStr& s) {
       zxStr other;
       other = s;
     }},
    {"assign string",
     [](zxStr& s) {
       const zxStr other("x");
       s = other;
     }},
    {"assign temporary", [](zxStr& s) { s = zxStr("x"); }},
    {"trim", [](zxStr& s) { trim(s); }},
    {"strip_line_end", [](zxStr& s) { strip_line_end(s); }},
    {"assign text", [](zxStr& s) { s = "x"; }},
    {"assign byte", [](zxStr& s) { s = 'x'; }},
    {"build", [](zxStr& s) { s.build("x", 1); }},
    {"is_empty", [](zxStr& s) { static_cast<void>(s.is_empty()); }},
    {"operator[]", [](zxStr& s) { static_cast<void>(s[0]); }},
    {"at", [](zxStr& s) { s.at(0) = 'x'; }},
    {"== string", [](zxStr& s) { static_cast<void>(s == zxStr("x")); }},
    {"== text", [](zxStr& s) { static_cast<void>(s == "x"); }},
    {"== byte", [](zxStr& s) { static_cast<void>(s == 'x'); }},
    {"reserve", [](zxStr& s) { s.reserve(200); }},
    {"set_length", [](zxStr& s) { s.set_length(200); }},
    {"buffer", [](zxStr& s) { s.buffer(3); }},
    {"sync_length", [](zxStr& s) { s.sync_length(); }},
    {"append byte", [](zxStr& s) { s.append('x'); }},
    {"append text", [](zxStr& s) { s.append("x"); }},
    {"append bytes", [](zxStr& s) { s.append("x", 1); }},
    {"append string", [](zxStr& s) { s.append(zxStr("x")); }},
    {"append to another",
     [](zxStr& s) {
       zxStr other;
       other.append(s);
     }},
    {"copy_to",
     [](zxStr& s) {
       char out[200];
       s.copy_to(out, 200);
     }},
    {"clear", [](zxStr& s) { s.clear(); }},
    {"unshare", [](zxStr& s) { s.unshare(); }},
    {"to_upper", [](zxStr& s) { s.to_upper(); }},
    {"to_lower", [](zxStr& s) { s.to_lower(); }},
    {"to_int", [](zxStr& s) { s.to_int(); }},
    {"string + string", [](zxStr& s) { s + zxStr("x"); }},
    {"string + string behind", [](zxStr& s) { zxStr("x") + s; }},
    {"string + text", [](zxStr& s) { s + "x"; }},
    {"text + string", [](zxStr& s) { "x" + s; }},
    {"string + byte", [](zxStr& s) { s + 'x'; }},
    {"byte + string", [](zxStr& s) { 'x' + s; }},
};

// A way in which a block can be corrupt; it is "hello" in a room of 70.
struct Corruption {
  const char* name;
  void (*corrupt)(zxStrRep&);
};

const Corruption k_corruptions[] = {
    {"negative length", [](zxStrRep& r) { r.length = -1; }},
    {"length above capacity", [](zxStrRep& r) { r.length = 71; }},
    {"negative capacity", [](zxStrRep& r) { r.capacity = -1; }},
    {"negative refs", [](zxStrRep& r) { r.refs = -1; }},
    {"no NUL", [](zxStrRep& r) { r.data[5] = 'X'; }},
};

// An operation without the check would crash on this one.
const Corruption k_length_far_off = {
    "length far above capacity", [](zxStrRep& r) { r.length = 0x40000000; }};

// A string of its own whose block is corrupted and put right again.
class Corrupted {
 public:
  explicit Corrupted(void (*corrupt)(zxStrRep&)) {
    text.reserve(70);
    block = const_cast<zxStrRep*>(text.representation());
    std::memset(block->data + 6, '\0', 68);
    std::memcpy(good, block, sizeof good);
    corrupt(*block);
    std::memcpy(bad, block, sizeof bad);
  }
  ~Corrupted() {
    // An operation that went on may have freed the block.
    if (text.representation() == block) std::memcpy(block, good, sizeof good);
  }
  Corrupted(const Corrupted&) = delete;
  Corrupted& operator=(const Corrupted&) = delete;

  bool is_untouched() const {
    return text.representation() == block &&
           std::memcmp(block, bad, sizeof bad) == 0;
  }

  zxStr text{"hello"};

 private:
  zxStrRep* block;
  char good[70 + 16];
  char bad[70 + 16];
};

void expect_checks(const Corruption& corruption) {
  for (const Operation& operation : k_checked_operations) {
    SCOPED_TRACE(std::string(corruption.name) + ", " + operation.name);
    Corrupted s(corruption.corrupt);
    EXPECT_ASSERTION(operation.call(s.text), "zxstr");
    EXPECT_TRUE(s.is_untouched());
  }
}

void expect_safe_return(const Corruption& corruption) {
  for (const Operation& operation : k_checked_operations) {
    SCOPED_TRACE(std::string(corruption.name) + ", " + operation.name);
    Corrupted s(corruption.corrupt);
    kit::with_failures_dropped([&] { operation.call(s.text); });
    EXPECT_TRUE(s.is_untouched());
  }
}

TEST(zxstr, every_operation_finds_a_corrupt_representation) {
  for (const Corruption& corruption : k_corruptions) expect_checks(corruption);
  ASSERT_FALSE(HasFailure());
  expect_checks(k_length_far_off);
}

TEST(zxstr, a_dropped_failure_leaves_a_corrupt_string_as_it_is) {
  for (const Corruption& corruption : k_corruptions)
    expect_safe_return(corruption);
  ASSERT_FALSE(HasFailure());
  expect_checks(k_corruptions[1]);
  ASSERT_FALSE(HasFailure());
  expect_safe_return(k_length_far_off);
}

TEST(zxstr, every_operation_finds_a_corrupt_inner_room) {
  const Corruption corruptions[] = {
      {"negative length", [](zxStrRep& r) { r.length = -1; }},
      {"length above the room", [](zxStrRep& r) { r.length = 101; }},
      {"negative capacity", [](zxStrRep& r) { r.capacity = -1; }},
      {"no NUL", [](zxStrRep& r) { r.data[5] = 'X'; }},
  };
  for (const Corruption& corruption : corruptions) {
    for (const Operation& operation : k_checked_operations) {
      SCOPED_TRACE(std::string(corruption.name) + ", " + operation.name);
      zxIStr s("hello");
      corruption.corrupt(*const_cast<zxStrRep*>(s.representation()));
      EXPECT_ASSERTION(operation.call(s), "zxstr");
      kit::with_failures_dropped([&] { operation.call(s); });
      EXPECT_TRUE(is_inside(s));
      EXPECT_EQ(std::string_view(s.c_str(), 5), "hello");
    }
  }
}

TEST(zxstr, equality_checks_the_other_string_too) {
  for (const auto& corruption : k_corruptions) {
    SCOPED_TRACE(corruption.name);
    Corrupted s(corruption.corrupt);
    EXPECT_ASSERTION(zxStr("hello") == s.text, "zxstr");
  }
}

TEST(zxstr, an_assertion_names_the_module_and_a_line) {
  const kit::Failure failure = kit::failure_of([] { zxStr("abc")[3]; });
  EXPECT_EQ(failure.line.substr(0, 26),
            "[1000-1000-0/E-0/E/zxstr:"s + failure.message.substr(24, 1));
}

// --------------------------------------------------- failures with a text --

TEST(zxstr, failures_take_their_text_from_a_string) {
  EXPECT_FAILURE(bail_code(1010, zxStr("a.txt")), "1010: close: 'a.txt' failed",
                 "[1010-1010-0/E-0/E/a.txt/]");
  EXPECT_FAILURE(bail_code(1010, zxStr("a"), BailDetail(5, "why")),
                 "1010: close: 'a' failed (5: why)",
                 "[1010-1010-5/E-0/E/a/why]");
  EXPECT_FAILURE(bail_code(0, zxStr()), "", "[0-0-0/E-0/E//]");
}

// -------------------------------------------------------------- checksums --

// Bit by bit, the highest first.
std::uint16_t slow_crc16(std::uint16_t crc, std::string_view bytes) {
  for (const char byte : bytes) {
    for (int bit = 7; bit >= 0; --bit) {
      const bool in = (static_cast<unsigned char>(byte) >> bit & 1) != 0;
      const bool out = (crc & 0x8000) != 0;
      crc = static_cast<std::uint16_t>(crc << 1);
      if (in != out) crc = static_cast<std::uint16_t>(crc ^ 0x1021);
    }
  }
  return crc;
}

TEST(zxstr, crc16_has_its_known_values) {
  EXPECT_EQ(crc16("123456789", 9), 0x29B1);
  EXPECT_EQ(crc16("", 0), 0xFFFF);
  EXPECT_EQ(crc16(nullptr, 0), 0xFFFF);
  EXPECT_EQ(crc16("A", 1), 0xB915);
  EXPECT_EQ(crc16("\0", 1), 0xE1F0);
  EXPECT_EQ(crc16_add(0, "123456789", 9), 0x31C3);
  EXPECT_EQ(crc16_add(0x1234, "x", 0), 0x1234);
}

TEST(zxstr, crc16_is_that_of_the_bitwise_model) {
  constexpr unsigned k_seed = 4711;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  constexpr std::uint16_t k_starts[] = {0, 0xFFFF, 0x8000, 0x1D0F};
  for (int byte = 0; byte < 256; ++byte) {
    const char bytes[] = {static_cast<char>(byte)};
    for (const std::uint16_t start : k_starts)
      ASSERT_EQ(crc16_add(start, bytes, 1), slow_crc16(start, {bytes, 1}));
  }
  for (int round = 0; round < 2000; ++round) {
    std::string bytes(random() % 300, '\0');
    for (char& byte : bytes) byte = static_cast<char>(random());
    const std::uint16_t expected = slow_crc16(0xFFFF, bytes);
    ASSERT_EQ(crc16(bytes.data(), bytes.size()), expected);
    const std::size_t cut = bytes.empty() ? 0 : random() % bytes.size();
    const std::uint16_t first = crc16(bytes.data(), cut);
    ASSERT_EQ(crc16_add(first, bytes.data() + cut, bytes.size() - cut),
              expected);
  }
}

TEST(zxstr, crc16_is_the_same_at_every_length_place_and_split) {
  constexpr unsigned k_seed = 1234;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (std::size_t length = 0; length <= 64; ++length) {
    for (std::size_t place = 0; place < 16; ++place) {
      // The block ends with the bytes, so that a byte too many is noticed.
      const auto block = std::make_unique<char[]>(place + length);
      char* bytes = block.get() + place;
      for (std::size_t i = 0; i < length; ++i)
        bytes[i] = static_cast<char>(random());
      const auto start = static_cast<std::uint16_t>(random());
      const std::string_view all(bytes, length);
      ASSERT_EQ(crc16(bytes, length), slow_crc16(0xFFFF, all));
      const std::uint16_t expected = slow_crc16(start, all);
      for (std::size_t cut = 0; cut <= length; ++cut) {
        const std::uint16_t first = crc16_add(start, bytes, cut);
        ASSERT_EQ(first, slow_crc16(start, all.substr(0, cut)));
        ASSERT_EQ(crc16_add(first, bytes + cut, length - cut), expected);
      }
    }
  }
}

// Bit by bit, the lowest first.
std::uint32_t slow_crc32(std::uint32_t crc, std::string_view bytes) {
  for (const char byte : bytes) {
    for (int bit = 0; bit < 8; ++bit) {
      const bool in = (static_cast<unsigned char>(byte) >> bit & 1) != 0;
      const bool out = (crc & 1) != 0;
      crc >>= 1;
      if (in != out) crc ^= 0xEDB88320;
    }
  }
  return crc;
}

TEST(zxstr, crc32_is_the_complement_of_the_published_values) {
  const struct {
    std::string_view bytes;
    std::uint32_t published;
  } rows[] = {
      {"", 0},
      {"a", 0xE8B7BE43},
      {"abc", 0x352441C2},
      {"123456789", 0xCBF43926},
      {"The quick brown fox jumps over the lazy dog", 0x414FA339},
      {"\0\0\0\0"sv, 0x2144DF1C},
      {"\xFF\xFF\xFF\xFF", 0xFFFFFFFF},
  };
  for (const auto& row : rows)
    EXPECT_EQ(crc32(row.bytes.data(), row.bytes.size()), ~row.published)
        << testing::PrintToString(row.bytes);
  EXPECT_EQ(crc32(nullptr, 0), 0xFFFFFFFF);
  EXPECT_EQ(crc32_add(0x12345678, nullptr, 0), 0x12345678U);
}

TEST(zxstr, crc32_byte_is_one_step_of_the_bitwise_model) {
  constexpr std::uint32_t k_starts[] = {0, 1, 0x80000000, 0xFFFFFFFF,
                                        0x12345678};
  for (int byte = 0; byte < 256; ++byte) {
    const char bytes[] = {static_cast<char>(byte)};
    for (const std::uint32_t start : k_starts)
      ASSERT_EQ(crc32_byte(start, static_cast<std::uint8_t>(byte)),
                slow_crc32(start, {bytes, 1}));
  }
}

TEST(zxstr, crc32_is_the_same_at_every_length_place_and_split) {
  constexpr unsigned k_seed = 2468;
  std::printf("seed %u\n", k_seed);
  std::mt19937 random(k_seed);
  for (std::size_t length = 0; length <= 40; ++length) {
    for (std::size_t place = 0; place < 8; ++place) {
      // The block ends with the bytes, so that a byte too many is noticed.
      const auto block = std::make_unique<char[]>(place + length);
      char* bytes = block.get() + place;
      for (std::size_t i = 0; i < length; ++i)
        bytes[i] = static_cast<char>(random());
      const auto start = static_cast<std::uint32_t>(random());
      const std::string_view all(bytes, length);
      ASSERT_EQ(crc32(bytes, length), slow_crc32(0xFFFFFFFF, all));
      const std::uint32_t expected = slow_crc32(start, all);
      for (std::size_t cut = 0; cut <= length; ++cut) {
        const std::uint32_t first = crc32_add(start, bytes, cut);
        ASSERT_EQ(first, slow_crc32(start, all.substr(0, cut)));
        ASSERT_EQ(crc32_add(first, bytes + cut, length - cut), expected);
      }
    }
  }
}

// --------------------------------------------- random use against a model --

// The rules of one string, told with the standard library: holders share a
// block by a shared pointer, capacities are plain numbers, and the room
// inside an object is a block that nobody else holds.
class Model {
 public:
  Model() = default;
  explicit Model(bool inner_room) : inside(inner_room) {
    if (inside) block = std::make_shared<Block>(Block{"", k_room});
  }

  std::string text() const { return block ? block->text : ""; }
  std::int64_t capacity() const { return block ? block->capacity : 0; }
  std::int64_t refs() const { return inside ? 0 : block.use_count(); }
  bool is_inside() const { return inside; }
  bool shares(const Model& other) const { return block == other.block; }

  void assign(const Model& other) {
    if (block == other.block) return;
    if (other.text().empty()) {
      clear();
    } else if (inside && size_of(other.text()) <= k_room) {
      block->text = other.text();
    } else if (other.inside) {
      build(other.text());
    } else {
      block = other.block;
      inside = false;
    }
  }
  // Gives its block up, as a string can that is moved from.
  void let_go() {
    if (!inside) block = nullptr;
  }
  void build(const std::string& sum) {
    const bool own = refs() == 1;
    const std::int64_t wanted =
        own ? std::max(capacity(), size_of(sum)) : size_of(sum);
    block = std::make_shared<Block>(Block{sum, wanted});
    inside = false;
  }
  void append_byte(char byte) {
    const std::int64_t old_length = size_of(text());
    append(std::string(1, byte),
           old_length >= capacity() ? old_length + 64 : capacity());
  }
  void append_text(const std::string& more) {
    const std::int64_t sum = size_of(text() + more);
    append(more, sum >= capacity() ? sum + 64 : capacity());
  }
  void set_length(std::int64_t n) {
    if (n == size_of(text())) return;
    unshare();
    std::string changed = text();
    changed.resize(static_cast<std::size_t>(n));
    replace(changed, n > capacity() ? n + 64 : capacity());
  }
  void reserve(std::int64_t n) {
    if (n < size_of(text())) return;
    if (n == 0) {
      let_go();
    } else if (n > capacity()) {
      replace(text(), n);
    }
  }
  void unshare() {
    if (refs() > 1) replace(text(), size_of(text()));
  }
  void clear() {
    if (inside)
      block->text.clear();
    else
      block = nullptr;
  }
  void set(std::size_t i, char byte) {
    unshare();
    block->text[i] = byte;
  }
  // What is written through the pointer of an unshared string with a block.
  void write(const std::string& text) { block->text = text; }
  void fold(char first, int distance) {
    const std::string before = text();
    for (std::size_t i = 0; i < before.size(); ++i)
      if (before[i] >= first && before[i] < first + 26)
        set(i, static_cast<char>(before[i] + distance));
  }
  // A concatenation of two strings.
  static Model sum(const Model& a, const Model& b) {
    Model result;
    if (a.text().empty() || b.text().empty())
      result.assign(a.text().empty() ? b : a);
    else
      result.build(a.text() + b.text());
    return result;
  }
  static Model of(const std::string& text) {
    Model result;
    result.build(text);
    return result;
  }

 private:
  static constexpr std::int64_t k_room = 100;

  struct Block {
    std::string text;
    std::int64_t capacity;
  };
  static std::int64_t size_of(const std::string& text) {
    return static_cast<std::int64_t>(text.size());
  }
  // The block stays where it is if it is this string's alone, but for the
  // inner room, which does not grow.
  void replace(const std::string& text, std::int64_t capacity) {
    if (inside ? capacity == k_room : refs() == 1) {
      *block = {text, capacity};
    } else {
      block = std::make_shared<Block>(Block{text, capacity});
      inside = false;
    }
  }
  void append(const std::string& more, std::int64_t grown_capacity) {
    const std::string sum = text() + more;
    replace(sum, refs() > 1 ? size_of(sum) : grown_capacity);
  }

  std::shared_ptr<Block> block;  // null: the shared empty one
  bool inside = false;
};

zxStr passed_by_value(zxStr text) { return text; }

// Strings and models that go through the same changes.  The second half of
// the strings are made with room inside.
class Pairs {
 public:
  explicit Pairs(unsigned seed) : random(seed) {
    for (std::size_t i = k_plain; i < k_all; ++i) model[i] = Model(true);
  }

  void step() {
    const std::size_t i = pick(k_all);
    const std::size_t j = pick(k_all);
    zxStr& s = real(i);
    Model& m = model[i];
    const std::string more = any_text();
    switch (pick(28)) {
      case 0:
        s = real(j);
        m.assign(model[j]);
        break;
      case 1:
        s = more.c_str();
        m.build(more.c_str());
        break;
      case 2:
        s = 'b';
        m.build("b");
        break;
      case 3:
        s.append(real(j));
        m.append_text(model[j].text());
        break;
      case 4:
        s += more.c_str();
        m.append_text(more.c_str());
        break;
      case 5:
        append_bytes(s, m);
        break;
      case 6:
        s.append(more.data(), zx_count(more.size()));
        m.append_text(more);
        break;
      case 7:
        s.clear();
        m.clear();
        break;
      case 8:
        s.unshare();
        m.unshare();
        break;
      case 9:
        resize(s, m);
        break;
      case 10:
        reserve(s, m);
        break;
      case 11:
        s.to_upper();
        m.fold('a', -32);
        break;
      case 12:
        s.to_lower();
        m.fold('A', 32);
        break;
      case 13:
        write(s, m);
        break;
      case 14:
        fill(s, m);
        break;
      case 15:
        append_own_part(s, m);
        break;
      case 16:
        build_from_own_parts(s, m);
        break;
      case 17:
        assign_own_part(s, m);
        break;
      case 18:
        move(i, j);
        break;
      case 19:
        swap(i, j);
        break;
      case 20: {
        s = passed_by_value(real(j));
        Model passed;
        passed.assign(model[j]);
        m.assign(passed);
        break;
      }
      case 21: {
        const Model sum = Model::sum(Model::sum(m, model[j]), model[i]);
        s = s + real(j) + s;
        m.assign(sum);
        break;
      }
      case 22:
        add_texts(s, m, more.c_str());
        break;
      case 23:
      case 24:
      case 25:
      case 26:
        make_anew(i, j, more);
        break;
      default:
        s.build(more.data(), zx_count(more.size()));
        m.build(more);
    }
    if (real(i).length() > 1500) make_empty(i);
  }

  void check() const {
    for (std::size_t i = 0; i < k_all; ++i) {
      const zxStr& s = real(i);
      const Model& m = model[i];
      ASSERT_EQ(s.view(), m.text());
      ASSERT_EQ(s.capacity(), m.capacity());
      ASSERT_EQ(refs(s), m.refs());
      ASSERT_EQ(s.c_str()[s.length()], '\0');
      ASSERT_EQ(i >= k_plain && is_inside(roomy[i - k_plain]), m.is_inside());
      ASSERT_EQ(is_shared_empty(s), m.capacity() == 0 && m.refs() == 0);
      std::int32_t holders = 0;
      for (std::size_t j = 0; j < k_all; ++j) {
        holders += share(s, real(j));
        ASSERT_EQ(share(s, real(j)), i == j || m.shares(model[j]));
      }
      if (refs(s) != 0) {
        ASSERT_EQ(refs(s), holders);
      }
    }
    const std::size_t i = steps++ % k_all;
    for (std::size_t j = 0; j < k_all; ++j) {
      const std::string a = model[i].text();
      const std::string b = model[j].text();
      ASSERT_EQ(real(i) == real(j), a == b);
      ASSERT_EQ(real(i) <=> real(j), slow_order(a, b));
    }
  }

 private:
  static constexpr std::size_t k_plain = 4;
  static constexpr std::size_t k_all = 8;

  zxStr& real(std::size_t i) {
    return i < k_plain ? plain[i] : roomy[i - k_plain];
  }
  const zxStr& real(std::size_t i) const {
    return i < k_plain ? plain[i] : roomy[i - k_plain];
  }

  std::size_t pick(std::size_t count) { return random() % count; }

  // Mostly short, with NUL bytes and letters of both cases; never empty, for
  // how an empty text from a constructor is held is not fixed.
  std::string any_text() {
    std::string text(1 + pick(pick(8) == 0 ? 300 : 12), '\0');
    constexpr std::string_view k_bytes = "abcXYZ019 \0\xE0"sv;
    for (char& byte : text) byte = k_bytes[pick(k_bytes.size())];
    return text;
  }
  void append_bytes(zxStr& s, Model& m) {
    for (std::size_t left = 1 + pick(pick(8) == 0 ? 110 : 3); left > 0;
         --left) {
      s += 'b';
      m.append_byte('b');
    }
  }
  void resize(zxStr& s, Model& m) {
    const std::int32_t n =
        pick(3) == 0 ? s.length() : static_cast<std::int32_t>(pick(200));
    s.set_length(n);
    m.set_length(n);
  }
  void reserve(zxStr& s, Model& m) {
    const std::int32_t n =
        pick(3) == 0 ? s.length() : static_cast<std::int32_t>(pick(400));
    s.reserve(n);
    m.reserve(n);
  }
  void write(zxStr& s, Model& m) {
    if (s.is_empty()) return;
    const std::size_t i = pick(m.text().size());
    s.at(static_cast<std::int32_t>(i)) = 'W';
    m.set(i, 'W');
  }
  // What a function that writes into a buffer does.
  void fill(zxStr& s, Model& m) {
    const std::size_t room = 1 + pick(150);
    const std::size_t used = pick(room + 1);
    char* place = s.buffer(static_cast<std::int32_t>(room));
    std::memset(place, 'f', used);
    place[used] = '\0';
    s.sync_length();
    m.set_length(static_cast<std::int64_t>(room));
    m.unshare();
    m.write(std::string(used, 'f'));
  }
  void append_own_part(zxStr& s, Model& m) {
    const std::size_t from = pick(m.text().size() + 1);
    const std::size_t size = pick(m.text().size() - from + 1);
    s.append(s.c_str() + from, zx_count(size));
    m.append_text(m.text().substr(from, size));
  }
  void build_from_own_parts(zxStr& s, Model& m) {
    const std::string text = m.text();
    const std::size_t a = pick(text.size() + 1);
    const std::size_t b = pick(text.size() + 1);
    s.build(s.c_str() + a, zx_count(text.size() - a), s.c_str() + b,
            zx_count(text.size() - b));
    m.build(text.substr(a) + text.substr(b));
  }
  void assign_own_part(zxStr& s, Model& m) {
    const std::string text = m.text();
    const std::size_t from = pick(text.size() + 1);
    s = s.c_str() + from;
    m.build(text.c_str() + from);
  }
  void add_texts(zxStr& s, Model& m, const char* more) {
    const Model as_model = *more != '\0' ? Model::of(more) : Model();
    Model sum = Model::sum(m, as_model);
    switch (pick(4)) {
      case 0:
        s = s + more;
        break;
      case 1:
        s = more + s;
        sum = Model::sum(as_model, m);
        break;
      case 2:
        s = s + 'c';
        sum = Model::of(m.text() + 'c');
        break;
      default:
        s = 'c' + s;
        sum = Model::of('c' + m.text());
    }
    m.assign(sum);
  }

  // A string that was moved from is as it was, or the shared empty one.
  void let_go_if(const zxStr& from, Model& from_model) {
    if (is_shared_empty(from)) from_model.let_go();
  }
  void move(std::size_t to, std::size_t from) {
    model[to].assign(model[from]);
    if (to >= k_plain && from >= k_plain && pick(2) == 0)
      roomy[to - k_plain] = std::move(roomy[from - k_plain]);
    else
      real(to) = std::move(real(from));
    if (to != from) let_go_if(real(from), model[from]);
  }
  void swap(std::size_t i, std::size_t j) {
    zxStr kept(std::move(real(i)));
    Model kept_model;
    kept_model.assign(model[i]);
    let_go_if(real(i), model[i]);
    move(i, j);
    model[j].assign(kept_model);
    real(j) = std::move(kept);
  }

  void make_empty(std::size_t i) {
    if (i < k_plain) {
      std::destroy_at(&plain[i]);
      std::construct_at(&plain[i]);
    } else {
      std::destroy_at(&roomy[i - k_plain]);
      std::construct_at(&roomy[i - k_plain]);
    }
    model[i] = Model(i >= k_plain);
  }
  // In place of one string another is made, from string j or from a text.
  void make_anew(std::size_t i, std::size_t j, const std::string& text) {
    make_empty(i);
    if (i == j) return;
    if (i < k_plain)
      make_plain(i, j, text);
    else
      make_roomy(i, j, text);
  }
  void make_plain(std::size_t i, std::size_t j, const std::string& text) {
    zxStr* place = &plain[i];
    std::destroy_at(place);
    switch (pick(4)) {
      case 0:
        std::construct_at(place, std::as_const(real(j)));
        model[i].assign(model[j]);
        break;
      case 1:
        std::construct_at(place, std::move(real(j)));
        model[i].assign(model[j]);
        let_go_if(real(j), model[j]);
        break;
      case 2:
        std::construct_at(place, text[0]);
        model[i].build(text.substr(0, 1));
        break;
      default:
        std::construct_at(place, text.data(), zx_count(text.size()));
        model[i].build(text);
    }
  }
  void make_roomy(std::size_t i, std::size_t j, const std::string& text) {
    zxIStr* place = &roomy[i - k_plain];
    std::destroy_at(place);
    switch (pick(4)) {
      case 0:
        std::construct_at(place, std::as_const(real(j)));
        model[i].assign(model[j]);
        break;
      case 1:
        if (j >= k_plain)
          std::construct_at(place, roomy[j - k_plain]);
        else
          std::construct_at(place, plain[j]);
        model[i].assign(model[j]);
        break;
      case 2:
        if (j >= k_plain)
          std::construct_at(place, std::move(roomy[j - k_plain]));
        else
          std::construct_at(place, std::move(plain[j]));
        model[i].assign(model[j]);
        let_go_if(real(j), model[j]);
        break;
      default:
        std::construct_at(place, text.data(), zx_count(text.size()));
        model[i].assign(Model::of(text));
    }
  }

  std::mt19937 random;
  mutable std::size_t steps = 0;
  std::array<zxStr, k_plain> plain;
  std::array<zxIStr, k_all - k_plain> roomy;
  std::array<Model, k_all> model;
};

void run_pairs(unsigned seed, int steps) {
  std::printf("seed %u\n", seed);
  Pairs pairs(seed);
  for (int i = 0; i < steps && !testing::Test::HasFatalFailure(); ++i) {
    SCOPED_TRACE("step " + std::to_string(i));
    pairs.step();
    pairs.check();
  }
}

TEST(zxstr, random_use_gives_text_capacity_and_sharing_of_the_model) {
  for (const unsigned seed : {1U, 2U, 3U, 4U, 5U}) run_pairs(seed, 20'000);
}

TEST(zxstr_slow, long_random_use_gives_what_the_model_gives) {
  for (unsigned seed = 100; seed < 120; ++seed) run_pairs(seed, 100'000);
}

}  // namespace
