// zxmisc_test.cpp - tests of zxlib/zxmisc.h and zxmisc.cpp: source positions,
// the allocator slot, the class table of bytes, checked casts.

#include "zxmisc.h"

#include <gtest/gtest.h>

#include <cctype>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "zxatsys.h"
#include "zxatsys_impl.h"
#include "zxplat.h"
#include "zxsfmt.h"
#include "zxstr.h"

namespace {

using kit::expect_end;
using kit::Outcome;
using kit::outcome_of;
using kit::Recorder;
using kit::say;
using kit::screen;
using kit::start;

// More than any address space has, and no overflow in itself.
constexpr std::size_t k_absurd_size = SIZE_MAX / 2;

// The heap gives out while another failure is being handled.
ZX_CASE(zxmisc_exhausts_the_heap_during_a_failure) {
  bail_guard = true;
  zx_realloc(nullptr, k_absurd_size);
  return 0;
}

// --------------------------------------------------- positions in sources --

TEST(zxmisc, pos_string_is_name_colon_line) {
  const struct {
    const char* name;
    std::int32_t line;
    const char* text;
  } rows[] = {
      {"a", 1, "a:1"},
      {"", 5, ":5"},
      {"zxstr", 0, "zxstr:0"},
      {"zxstr", -1, "zxstr:-1"},
      {"zxstr", INT32_MAX, "zxstr:2147483647"},
      {"zxstr", INT32_MIN, "zxstr:-2147483648"},
      {"zxstr.cpp", 7, "zxstr.cpp:7"},
      // 19 and 20 bytes: shown as they are.
      {"abcdefghijklmno.cpp", 7, "abcdefghijklmno.cpp:7"},
      {"abcdefghijklmnop.cpp", 7, "abcdefghijklmnop.cpp:7"},
      {"abcdefghijklmnopqrst", 7, "abcdefghijklmnopqrst:7"},
      // 21 to 24 with the ending: 17 to 20 stay, all of them shown.
      {"abcdefghijklmnopq.cpp", 7, "~bcdefghijklmnopq:7"},
      {"abcdefghijklmnopqr.cpp", 7, "~bcdefghijklmnopqr:7"},
      {"abcdefghijklmnopqrs.cpp", 7, "~bcdefghijklmnopqrs:7"},
      {"abcdefghijklmnopqrst.cpp", 7, "~bcdefghijklmnopqrst:7"},
      {"abcdefghijklmnopqrstu.cpp", 7, "~cdefghijklmnopqrstu:7"},
      // The ending counts in any case.
      {"abcdefghijklmnopq.CPP", 7, "~bcdefghijklmnopq:7"},
      {"abcdefghijklmnopq.cPp", 7, "~bcdefghijklmnopq:7"},
      // Any other ending is part of the name.
      {"abcdefghijklmnopqrstu", 7, "~cdefghijklmnopqrstu:7"},
      {"abcdefghijklmnopqrs.h", 7, "~cdefghijklmnopqrs.h:7"},
      {"abcdefghijklmnop.cpp.", 7, "~cdefghijklmnop.cpp.:7"},
      {"abcdefghijklmnopqxcpp", 7, "~cdefghijklmnopqxcpp:7"},
      {"abcdefghijklmno.cpp.cpp", 7, "~bcdefghijklmno.cpp:7"},
      {"folder/of/some/depth/abcdefghij.cpp", 12, "~me/depth/abcdefghij:12"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    zxPos position{row.name, row.line};
    EXPECT_STREQ(pos_string(position), row.text);
    EXPECT_EQ(position.file, row.name);
    EXPECT_EQ(position.line, row.line);
  }
}

TEST(zxmisc, pos_string_makes_a_null_file_point_at_a_question_mark) {
  zxPos position{nullptr, 12};
  EXPECT_STREQ(pos_string(position), "?:12");
  EXPECT_STREQ(position.file, "?");
  EXPECT_EQ(position.line, 12);
}

TEST(zxmisc, pos_string_is_bounded_for_names_of_any_length) {
  for (const std::size_t length : {100U, 10'000U, 100'000U}) {
    const std::string name = std::string(length, 'x') + "tail";
    zxPos position{name.c_str(), INT32_MIN};
    EXPECT_EQ(pos_string(position),
              "~" + std::string(15, 'x') + "tail:-2147483648");
  }
}

TEST(zxmisc, pos_string_reuses_its_buffer) {
  zxPos first{"first", 1};
  zxPos second{"second", 2};
  const char* text = pos_string(first);
  EXPECT_EQ(pos_string(second), text);
  EXPECT_STREQ(text, "second:2");
}

TEST(zxmisc, here_stores_the_file_without_folders_and_the_line) {
  const zxPos before = zx_pos;
  const int line = __LINE__ + 1;
  ZX_HERE;
  EXPECT_STREQ(zx_pos.file, "zxmisc_test.cpp");
  EXPECT_EQ(zx_pos.line, line);
  zx_pos = before;
}

TEST(zxmisc, a_module_word_is_the_file_name_without_folders_and_ending) {
  EXPECT_STREQ(ZX_MODULE, "zxmisc_test");
  EXPECT_STREQ(zxModuleWord{"/work/zxlib/zxstr.cpp"}.text, "zxstr");
  EXPECT_STREQ(zxModuleWord{"C:\\work\\zxlib\\zxqva.h"}.text, "zxqva");
  EXPECT_STREQ(zxModuleWord{"plain"}.text, "plain");
  EXPECT_STREQ(zxModuleWord{"a.b/two.dots.h"}.text, "two");
  EXPECT_STREQ(zxModuleWord{""}.text, "");
}

TEST(zxmisc, a_base_name_is_what_follows_the_last_separator) {
  EXPECT_STREQ(zx_base_name("zxstr.cpp"), "zxstr.cpp");
  EXPECT_STREQ(zx_base_name("a/b\\c.h"), "c.h");
  EXPECT_STREQ(zx_base_name("a\\b/c.h"), "c.h");
  EXPECT_STREQ(zx_base_name("folder/"), "");
  EXPECT_STREQ(zx_base_name(""), "");
}

// ----------------------------------------------------------- byte classes --

// The classes of a byte by definitions of the test's own: those of ASCII by
// the standard character tests, the Hebrew ones by their ranges.
unsigned expected_classes(int byte) {
  if (byte >= 128)
    return byte <= 154                  ? k_class_hebdos
           : byte >= 224 && byte <= 250 ? k_class_hebrew
                                        : 0;
  return (std::isspace(byte) ? k_class_space : 0) |
         (std::isdigit(byte) ? k_class_digit : 0) |
         (std::isupper(byte) ? k_class_upper : 0) |
         (std::islower(byte) ? k_class_lower : 0) |
         (std::iscntrl(byte) ? k_class_control : 0) |
         (std::ispunct(byte) ? k_class_punct : 0);
}

TEST(zxmisc, every_byte_has_its_classes) {
  for (int byte = 0; byte < 256; ++byte) {
    SCOPED_TRACE(byte);
    const char as_char = static_cast<char>(byte);
    const unsigned expected = expected_classes(byte);
    EXPECT_EQ(zxCharClass[static_cast<std::size_t>(byte)], expected);
    for (unsigned bit = 1; bit < 256; bit *= 2)
      EXPECT_EQ(zx_is(as_char, bit), (expected & bit) != 0) << bit;
    EXPECT_EQ(zx_is_digit(as_char), byte >= 48 && byte <= 57);
    EXPECT_EQ(zx_is_space(as_char), byte == 32 || (byte >= 9 && byte <= 13));
    EXPECT_EQ(zx_is(as_char, k_class_latin),
              (byte >= 65 && byte <= 90) || (byte >= 97 && byte <= 122));
  }
}

TEST(zxmisc, the_class_bits_are_eight_different_ones) {
  EXPECT_EQ(k_class_space | k_class_digit | k_class_upper | k_class_lower |
                k_class_hebrew | k_class_control | k_class_punct |
                k_class_hebdos,
            0xFFU);
  EXPECT_EQ(k_class_latin, k_class_upper | k_class_lower);
}

TEST(zxmisc, only_ascii_letters_have_another_case) {
  for (int byte = 0; byte < 256; ++byte) {
    SCOPED_TRACE(byte);
    const char as_char = static_cast<char>(byte);
    const int upper = byte < 128 ? std::toupper(byte) : byte;
    const int lower = byte < 128 ? std::tolower(byte) : byte;
    EXPECT_EQ(zx_upper(as_char), static_cast<char>(upper));
    EXPECT_EQ(zx_lower(as_char), static_cast<char>(lower));
  }
}

// ------------------------------------------- casts, types, program traits --

TEST(zxmisc, a_length_beyond_31_bits_counts_as_minus_one) {
  EXPECT_EQ(zx_count(0), 0);
  EXPECT_EQ(zx_count(1), 1);
  EXPECT_EQ(zx_count(0x7FFFFFFF), INT32_MAX);
  EXPECT_EQ(zx_count(0x80000000U), -1);
  EXPECT_EQ(zx_count(0xFFFFFFFFU), -1);
  EXPECT_EQ(zx_count(SIZE_MAX), -1);
  if constexpr (sizeof(std::size_t) > 4) {
    EXPECT_EQ(zx_count(SIZE_MAX / 0xFFFFFFFFU), -1);  // 2^32 + 1
  }
}

TEST(zxmisc, a_count_as_a_size_is_the_same_number) {
  EXPECT_EQ(zx_size(0), 0U);
  EXPECT_EQ(zx_size(INT32_MAX), 0x7FFFFFFFU);
}

TEST(zxmisc, types_move_by_their_bytes_if_they_say_so) {
  struct Plain {
    int number;
    const char* text;
  };
  EXPECT_TRUE(zx_relocatable<int>);
  EXPECT_TRUE(zx_relocatable<void*>);
  EXPECT_TRUE(zx_relocatable<Plain>);
  EXPECT_TRUE(zx_relocatable<zxStr>);
  EXPECT_FALSE(zx_relocatable<std::string>);
}

TEST(zxmisc, the_traits_of_a_console_program_are_6) {
  EXPECT_EQ(k_trait_console, 2U);
  EXPECT_EQ(k_trait_executable, 4U);
}

// --------------------------------------------------------- allocator slot --

TEST(zxmisc, the_allocator_slot_takes_resizes_and_frees) {
  auto* block = static_cast<char*>(zx_realloc(nullptr, 3));
  ASSERT_NE(block, nullptr);
  std::memcpy(block, "abc", 3);
  block = static_cast<char*>(zx_realloc(block, 100'000));
  ASSERT_NE(block, nullptr);
  EXPECT_EQ(std::string_view(block, 3), "abc");
  std::memset(block + 3, 'x', 100'000 - 3);
  block = static_cast<char*>(zx_realloc(block, 5));
  ASSERT_NE(block, nullptr);
  EXPECT_EQ(std::string_view(block, 5), "abcxx");
  EXPECT_EQ(zx_realloc(block, 0), nullptr);
}

TEST(zxmisc, an_exhausted_heap_is_message_2000) {
  EXPECT_FAILURE(zx_realloc(nullptr, k_absurd_size), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
}

TEST(zxmisc, a_resize_on_an_exhausted_heap_leaves_the_block) {
  auto* block = static_cast<char*>(zx_realloc(nullptr, 4));
  std::memcpy(block, "abcd", 4);
  EXPECT_FAILURE(zx_realloc(block, k_absurd_size), "2000: malloc: out of mem",
                 "[2000-2000-0/E-0/E//]");
  EXPECT_EQ(std::string_view(block, 4), "abcd");
  zx_realloc(block, 0);
}

// No caller could go on without its block, so this failure is not dropped.
TEST(zxmisc, an_exhausted_heap_during_a_failure_ends_the_process) {
  const kit::ProcessResult result =
      kit::run_case("zxmisc_exhausts_the_heap_during_a_failure");
  EXPECT_FALSE(result.timed_out);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out, "");
}

ZX_CASE(zxmisc_exhausts_the_heap) {
  start();
  std::atexit([] { say("handler"); });
  oprint("working");
  zx_realloc(nullptr, k_absurd_size);
  return 0;
}

TEST(zxmisc, an_exhausted_heap_ends_the_process_as_any_failure) {
  const kit::ProcessResult process =
      outcome_of("zxmisc_exhausts_the_heap").process;
  EXPECT_FALSE(process.timed_out);
  EXPECT_EQ(process.exit_code, 100);
  EXPECT_EQ(process.out,
            "working" +
                screen("2000: malloc: out of mem", "[2000-2000-0/8-0/8//]") +
                "handler");
}

// ------------------------------------- the slot of a module: the beginning --

constexpr char k_early_box[] =
    "box 4112 fatal init error: Using static string/array in a ZXL.";

// A recorder of a program of these traits, whose library has been started or
// not.
class Program : public Recorder {
 public:
  Program(std::uint32_t its_traits, bool is_started) {
    traits = its_traits;
    zx_is_started = is_started;
  }
  ~Program() { zx_is_started = true; }
};

TEST(zxmisc, a_module_that_is_not_started_can_have_no_memory) {
  for (const std::uint32_t its_traits : {0U, k_trait_console}) {
    const Program module(its_traits, false);
    void* block = zx_heap_realloc(nullptr, 10);
    EXPECT_EQ(module.events, (std::vector<std::string>{k_early_box, "exit 9"}));
    block = zx_heap_realloc(block, 20);
    EXPECT_EQ(module.events, (std::vector<std::string>{k_early_box, "exit 9",
                                                       k_early_box, "exit 9"}));
    zx_is_started = true;
    zx_heap_realloc(block, 0);
  }
}

TEST(zxmisc, a_static_string_of_a_module_is_told_when_it_is_made) {
  const Program module(k_trait_console, false);
  const zxStr nothing;
  EXPECT_EQ(module.events, std::vector<std::string>{});
  const zxStr text("text");
  EXPECT_EQ(module.events, (std::vector<std::string>{k_early_box, "exit 9"}));
  zx_is_started = true;
}

TEST(zxmisc, started_modules_and_programs_have_memory) {
  const struct {
    std::uint32_t its_traits;
    bool is_started;
  } rows[] = {
      {0, true},
      {k_trait_console, true},
      {k_trait_executable, false},
      {k_trait_executable, true},
      {k_trait_console | k_trait_executable, false},
  };
  for (const auto& row : rows) {
    const Program program(row.its_traits, row.is_started);
    void* block = zx_heap_realloc(nullptr, 10);
    EXPECT_NE(block, nullptr);
    block = zx_heap_realloc(block, 1000);
    EXPECT_NE(block, nullptr);
    EXPECT_EQ(zx_heap_realloc(block, 0), nullptr);
    EXPECT_EQ(program.events, std::vector<std::string>{});
  }
}

ZX_CASE(zxmisc_module_asks_early) {
  traits = k_trait_console;
  std::atexit([] { say("handler"); });
  const zxStr text("text");
  say("not here");
  return text.length();
}

TEST(zxmisc, a_module_that_asks_for_memory_too_early_ends_with_9) {
  const Outcome outcome = outcome_of("zxmisc_module_asks_early");
  expect_end(outcome.process, "handler", 9);
  EXPECT_EQ(outcome.box,
            "fatal init error\n0x1010\nUsing static string/array in a ZXL.\n");
  EXPECT_EQ(outcome.dump, "");
}

// ------------------------------------------- the slot of a module: the end --

TEST(zxmisc, behind_the_cleanup_of_a_module_there_is_no_memory) {
  constexpr char k_late_box[] =
      "box 4112 fatal cleanup error: Using static string/array in a ZXL - "
      "realloc called after cleanup";
  const Recorder recorder;
  EXPECT_EQ(zx_realloc_after_cleanup(nullptr, 0), nullptr);
  EXPECT_EQ(zx_realloc_after_cleanup(nullptr, 10), nullptr);
  EXPECT_EQ(recorder.events, std::vector<std::string>{});
  char block[] = "bytes";
  for (const std::size_t size : {0U, 1U, 100U})
    EXPECT_EQ(zx_realloc_after_cleanup(block, size), nullptr);
  EXPECT_EQ(recorder.events,
            (std::vector<std::string>{k_late_box, "break", k_late_box, "break",
                                      k_late_box, "break"}));
  EXPECT_STREQ(block, "bytes");
}

void say_what_is_in_the_slot() {
  say(zx_realloc == zx_realloc_after_cleanup ? "cleanup "
      : zx_realloc == zx_heap_realloc        ? "heap "
                                             : "other ");
}

// Destroyed behind the library's end, as it is older than its start.
zxStr last_text;

ZX_CASE(zxmisc_slot_at_the_end) {
  if (argc > 1) traits &= ~k_trait_executable;
  std::atexit(say_what_is_in_the_slot);
  start();
  std::atexit(say_what_is_in_the_slot);
  if (argc > 2) last_text = argv[2];
  return 7;
}

TEST(zxmisc, only_a_modules_slot_is_closed_at_the_end) {
  const Outcome program = outcome_of("zxmisc_slot_at_the_end");
  expect_end(program.process, "heap heap ", 7);
  EXPECT_EQ(program.box, "");
  const Outcome module = outcome_of("zxmisc_slot_at_the_end", {"module"});
  expect_end(module.process, "heap cleanup ", 7);
  EXPECT_EQ(module.box, "");
}

TEST(zxmisc, a_module_is_told_of_a_static_string_that_outlives_its_library) {
  const Outcome outcome =
      outcome_of("zxmisc_slot_at_the_end", {"module", "text"});
  expect_end(outcome.process, "heap cleanup ", 7);
  EXPECT_EQ(outcome.box,
            "fatal cleanup error\n0x1010\nUsing static string/array in a ZXL "
            "- realloc called after cleanup\n");
}

}  // namespace
