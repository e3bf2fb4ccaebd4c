// zxatsys_road_test.cpp - tests of the road of a failure from the emergency
// functions to the process end: order, hooks, the programs with a box, last
// words (zxlib/zxatsys.cpp, zxatsys_show.cpp).

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure_road.h"
#include "kit/tempdir.h"
#include "zxatsys.h"
#include "zxatsys_impl.h"
#include "zxplat.h"
#include "zxsfmt.h"

namespace {

using kit::expect_end;
using kit::Outcome;
using kit::outcome_of;
using kit::Recorder;
using kit::say;
using kit::screen;
using kit::start;

using Events = std::vector<std::string>;

constexpr char k_message_12[] = "1012: seek: operation failed";
constexpr char k_line_12[] = "[1012-1012-0/0-0/0//]";

// ------------------------------------------------------ hooks, in process --

// What a hook was called with last.
const char* hook_message = nullptr;
const char* hook_line = nullptr;

void note_hook(const char* message, const char* line) {
  hook_message = message;
  hook_line = line;
  Recorder::note("hook " + std::string(message) + "|" + line);
}

void note_modules(const char* message, const char* line) {
  EXPECT_EQ(message, hook_message);
  EXPECT_EQ(line, hook_line);
  Recorder::note("modules " + std::string(message) + "|" + line);
}

TEST(zxatsys_road,
     hook_and_module_manager_hear_of_a_failure_ahead_of_the_user) {
  const Recorder recorder;
  bail_hook = note_hook;
  bail_hooks.tell_modules = note_modules;
  zxplat::set_last_error(0);
  bail_code(1010, "f", BailDetail(3, "d"));
  const std::string message = "1010: close: 'f' failed (3: d)";
  const std::string line = "[1010-1010-3/0-0/0/f/d]";
  EXPECT_EQ(
      recorder.events,
      (Events{"hook " + message + "|" + line, "modules " + message + "|" + line,
              "print \r\npath vers Fatal Error " + message + " " + line,
              "dump " + message + " " + line, "break", "print \r\n",
              "exit 100"}));
}

TEST(zxatsys_road, a_hook_hears_of_a_quiet_message_without_a_line) {
  const Recorder recorder;
  bail_hook = note_hook;
  bail_hooks.tell_modules = note_modules;
  bail_code(1200);
  ASSERT_EQ(recorder.events.size(), 7U);
  EXPECT_EQ(recorder.events[0], "hook 1200:  user break|");
  EXPECT_EQ(recorder.events[1], "modules 1200:  user break|");
}

TEST(zxatsys_road, each_hook_slot_gives_its_old_value_back) {
  const Recorder recorder;
  const zxBailHook other = [](const char*, const char*) {};
  bail_hook = bail_hook_early = nullptr;
  EXPECT_EQ(set_bail_hook(note_hook, true), nullptr);
  EXPECT_EQ(bail_hook, note_hook);
  EXPECT_EQ(bail_hook_early, nullptr);
  EXPECT_EQ(set_bail_hook(other, false), nullptr);
  EXPECT_EQ(bail_hook, note_hook);
  EXPECT_EQ(bail_hook_early, other);
  EXPECT_EQ(set_bail_hook(other, true), note_hook);
  EXPECT_EQ(set_bail_hook(nullptr, false), other);
  EXPECT_EQ(bail_hook_early, nullptr);
  EXPECT_EQ(set_bail_hook(nullptr, true), other);
  EXPECT_EQ(bail_hook, nullptr);
}

TEST(zxatsys_road, the_early_hook_is_not_called) {
  const Recorder recorder;
  set_bail_hook(note_hook, false);
  bail_code(1012);
  bail_guard = false;
  bail_code(1200);
  EXPECT_EQ(recorder.events.size(), 10U);
  for (const std::string& event : recorder.events)
    EXPECT_FALSE(event.starts_with("hook")) << event;
}

// Texts of a failure often lie in static buffers.
constexpr std::string_view k_text = "text of the failure";
constexpr std::string_view k_detail = "detail of the failure";
char shared_text[k_text.size() + 1];
char shared_detail[k_detail.size() + 1];

void fail_with_shared_texts() {
  k_text.copy(shared_text, k_text.size());
  k_detail.copy(shared_detail, k_detail.size());
  bail_code(1010, shared_text, BailDetail(7, shared_detail));
}

constexpr char k_shared_message[] =
    "1010: close: 'text of the failure' failed (7: detail of the failure)";
constexpr char k_shared_line[] =
    "[1010-1010-7/0-0/0/text of the /detail of the fail]";

// Fails in every way and uses the static buffers that a failure may have its
// texts in.
void do_mischief() {
  std::memset(shared_text, 'Z', sizeof shared_text - 1);
  std::memset(shared_detail, 'Z', sizeof shared_detail - 1);
  zxPos position{"mischief", 99};
  pos_string(position);
  bail_code(1002, "mischief");
  bail_detail(1010, "mischief", BailDetail(7, "mischief"));
  bailf("mischief #", 1);
  bailf("# bad format");
  assert_fail(98, "mischief");
  EXPECT_FALSE(ZX_ASSERT(false));
  zxplat::set_last_error(77);
}

TEST(zxatsys_road, what_a_hook_does_leaves_the_reported_texts_alone) {
  const Recorder recorder;
  bail_hook = [](const char*, const char*) { do_mischief(); };
  bail_hooks.tell_modules = [](const char*, const char*) { do_mischief(); };
  zxplat::set_last_error(0);
  fail_with_shared_texts();
  ASSERT_EQ(recorder.events.size(), 5U);
  EXPECT_EQ(recorder.events[0],
            std::string("print \r\npath vers Fatal Error ") + k_shared_message +
                "\r\n           " + k_shared_line);
}

TEST(zxatsys_road, what_a_hook_does_leaves_the_reported_position_alone) {
  const Recorder recorder;
  bail_hook = [](const char*, const char*) { do_mischief(); };
  zxplat::set_last_error(0);
  assert_fail(55, "zxstr");
  ASSERT_EQ(recorder.events.size(), 5U);
  EXPECT_EQ(recorder.events[0],
            "print \r\npath vers Fatal Error 1000: bailed out: zxstr:55  "
            "[1000-1000-0/0-0/0/zxstr:55/]");
  EXPECT_STREQ(zx_pos.file, "zxstr");
  EXPECT_EQ(zx_pos.line, 55);
}

// ------------------------------------- programs without a console: the box --

// A recorder of a program without a console.
class Windowed : public Recorder {
 public:
  Windowed() {
    traits &= ~k_trait_console;
    zxplat::set_last_error(0);
  }
};

TEST(zxatsys_road, a_program_without_a_console_shows_a_box_first) {
  const Windowed recorder;
  bail_code(1012);
  const std::string told = std::string(k_message_12) + "\n" + k_line_12 + "\n";
  EXPECT_EQ(recorder.events, (Events{"box 4112 NAME FATAL ERROR (vers):  " +
                                         told + "Program Terminated.\n",
                                     "dump " + told, "break",
                                     "print \r\npath vers Fatal Error " + told +
                                         "\r\n           " + k_line_12,
                                     "dump " + told + " " + k_line_12, "break",
                                     "print \r\n", "exit 100"}));
}

TEST(zxatsys_road, a_hook_hears_of_a_failure_ahead_of_the_box) {
  const Windowed recorder;
  bail_hook = note_hook;
  bail_hooks.tell_modules = note_modules;
  bail_code(1012);
  ASSERT_EQ(recorder.events.size(), 10U);
  const std::string told = std::string(k_message_12) + "|" + k_line_12;
  EXPECT_EQ(recorder.events[0], "hook " + told);
  EXPECT_EQ(recorder.events[1], "modules " + told);
  EXPECT_TRUE(recorder.events[2].starts_with("box "));
}

TEST(zxatsys_road, the_prefix_stands_ahead_of_the_message_in_the_box_alone) {
  const struct {
    const char* prefix;
    std::string shown;
  } rows[] = {
      {"", " "},
      {nullptr, " "},
      {"Please call the office.\n\n", "Please call the office.\n\n "},
      {"%s%n%140d", "%s%n%140d "},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.shown);
    const Windowed recorder;
    bail_prefix = row.prefix;
    bail_code(0, "x");
    ASSERT_EQ(recorder.events.size(), 8U);
    EXPECT_EQ(recorder.events[0],
              "box 4112 NAME FATAL ERROR (vers): " + row.shown +
                  "x\n[0-0-0/0-0/0/x/]\n"
                  "Program Terminated.\n");
    EXPECT_EQ(recorder.events[1], "dump x\n[0-0-0/0-0/0/x/]\n");
  }
}

TEST(zxatsys_road, a_quiet_message_in_a_box_has_an_empty_line) {
  const Windowed recorder;
  bail_code(1200);
  EXPECT_EQ(recorder.events,
            (Events{"box 4112 NAME FATAL ERROR (vers):  1200:  user break\n\n"
                    "Program Terminated.\n",
                    "dump 1200:  user break\n\n", "break",
                    "print \r\npath vers Fatal Error 1200:  user break\n\n ",
                    "dump 1200:  user break\n\n ", "break", "print \r\n",
                    "exit 100"}));
}

// The message that is measured holds the line once already: of n bytes and
// a line of 15 + n, it makes 2n + 17, and with the line behind 3n + 32.
TEST(zxatsys_road, behind_a_box_the_longer_message_is_measured) {
  for (const std::size_t length : {10U, 11U}) {
    SCOPED_TRACE(length);
    const Windowed recorder;
    const std::string text(length, 'x');
    const std::string line = "[0-0-0/0-0/0/" + text + "/]";
    ASSERT_EQ(line.size(), length + 15);
    bail_code(0, text.c_str());
    ASSERT_EQ(recorder.events.size(), 8U);
    EXPECT_EQ(recorder.events[3],
              "print \r\npath vers Fatal Error " + text + "\n" + line + "\n" +
                  (length == 10 ? " " : "\r\n           ") + line);
  }
}

// The letters of code page 1255, and the bytes beside them.
TEST(zxatsys_road, behind_the_box_hebrew_letters_are_those_of_the_console) {
  std::string ansi = "\xDF";
  std::string dos = "\xDF";
  for (int letter = 0; letter < 27; ++letter) {
    ansi += static_cast<char>(224 + letter);
    dos += static_cast<char>(128 + letter);
  }
  ansi += "\xFB\x80\x9A\xFF";
  dos += "\xFB\x80\x9A\xFF";
  const Windowed recorder;
  bail_code(0, ansi.c_str());
  const std::string ansi_line = "[0-0-0/0-0/0/" + ansi.substr(0, 12) + "/]";
  const std::string dos_line = "[0-0-0/0-0/0/" + dos.substr(0, 12) + "/]";
  // The line is part of the message by then; itself it stays as it was.
  const std::string mapped = dos + "\n" + dos_line + "\n";
  EXPECT_EQ(recorder.events,
            (Events{"box 4112 NAME FATAL ERROR (vers):  " + ansi + "\n" +
                        ansi_line + "\nProgram Terminated.\n",
                    "dump " + mapped, "break",
                    "print \r\npath vers Fatal Error " + mapped +
                        "\r\n           " + ansi_line,
                    "dump " + mapped + " " + ansi_line, "break", "print \r\n",
                    "exit 100"}));
}

TEST(zxatsys_road, a_console_shows_hebrew_letters_as_they_came) {
  const Recorder recorder;
  zxplat::set_last_error(0);
  bail_code(0, "\xE0\xFA");
  ASSERT_EQ(recorder.events.size(), 5U);
  EXPECT_EQ(recorder.events[0],
            "print \r\npath vers Fatal Error \xE0\xFA "
            "[0-0-0/0-0/0/\xE0\xFA/]");
}

TEST(zxatsys_road, no_text_is_read_as_a_format) {
  static constexpr char k_format[] = "%s%n%140d";
  const Windowed recorder;
  bail_hooks.program_path = [] { return k_format; };
  bail_hooks.program_name = [] { return k_format; };
  bail_hooks.program_version = [] { return k_format; };
  bail_code(1010, k_format, BailDetail(7, k_format));
  const std::string line = "[1010-1010-7/0-0/0/%s%n%140d/%s%n%140d]";
  const std::string told =
      "1010: close: '%s%n%140d' failed (7: %s%n%140d)\n" + line + "\n";
  EXPECT_EQ(
      recorder.events,
      (Events{"box 4112 %s%n%140d FATAL ERROR (%s%n%140d):  " + told +
                  "Program Terminated.\n",
              "dump " + told, "break",
              "print \r\n%s%n%140d %s%n%140d Fatal Error " + told +
                  "\r\n           " + line,
              "dump " + told + " " + line, "break", "print \r\n", "exit 100"}));
}

TEST(zxatsys_road, ten_thousand_bytes_are_whole_in_box_dumps_and_screen) {
  const std::string text(10'000, 'x');
  const std::string detail(3000, 'd');
  const Windowed recorder;
  bail_code(1010, text.c_str(), BailDetail(7, detail.c_str()));
  const std::string line =
      "[1010-1010-7/0-0/0/xxxxxxxxxxxx/dddddddddddddddddd]";
  const std::string told =
      "1010: close: '" + text + "' failed (7: " + detail + ")\n" + line + "\n";
  EXPECT_EQ(
      recorder.events,
      (Events{
          "box 4112 NAME FATAL ERROR (vers):  " + told +
              "Program Terminated.\n",
          "dump " + told, "break",
          "print \r\npath vers Fatal Error " + told + "\r\n           " + line,
          "dump " + told + " " + line, "break", "print \r\n", "exit 100"}));
}

// The part of an event between what it must begin and end with; fails the
// test, and is empty, if it does not.
std::string inside(const std::string& event, const std::string& head,
                   const std::string& end) {
  const bool fits = event.size() >= head.size() + end.size() &&
                    event.starts_with(head) && event.ends_with(end);
  EXPECT_TRUE(fits) << event.substr(0, 60) << " ... "
                    << event.substr(event.size() > 90 ? event.size() - 90 : 0);
  if (!fits) return "";
  return event.substr(head.size(), event.size() - head.size() - end.size());
}

// However much of the message is lost, what is shown of it is right and the
// line stands behind it each time.
TEST(zxatsys_road, texts_of_any_length_leave_room_for_the_lines) {
  static const std::string text(100'000, 'x');
  const std::string detail(100'000, 'd');
  for (const bool with_detail : {false, true}) {
    SCOPED_TRACE(with_detail);
    const Windowed recorder;
    bail_hooks.program_path = [] { return text.c_str(); };
    bail_hooks.program_name = [] { return text.c_str(); };
    bail_hooks.program_version = [] { return text.c_str(); };
    bail_prefix = text.c_str();
    bail_code(1010, text.c_str(),
              with_detail ? BailDetail(INT32_MIN, detail.c_str()) : no_detail);
    const std::string line =
        with_detail
            ? "[1010-1010--2147483648/0-0/0/xxxxxxxxxxxx/dddddddddddddddddd]"
            : "[1010-1010-0/0-0/0/xxxxxxxxxxxx/]";
    ASSERT_EQ(recorder.events.size(), 8U);
    const std::string shown =
        inside(recorder.events[1], "dump 1010: close: '", "\n" + line + "\n");
    EXPECT_GT(shown.size(), 10'000U);
    EXPECT_EQ(shown, text.substr(0, shown.size()));
    const std::string told = "1010: close: '" + shown + "\n" + line + "\n";
    EXPECT_EQ(recorder.events[4], "dump " + told + " " + line);
    // As much of the message as there is room for, and all of its end.
    const std::string box = inside(recorder.events[0], "box 4112 xxxxxxxx",
                                   " " + told + "Program Terminated.\n");
    EXPECT_NE(box.find("x FATAL ERROR (xxxx"), std::string::npos);
    EXPECT_TRUE(box.ends_with("x")) << "the prefix";
    inside(recorder.events[3], "print \r\nxxxxxxxx",
           "x Fatal Error " + told + "\r\n           " + line);
    EXPECT_EQ(recorder.events[7], "exit 100");
  }
}

TEST(zxatsys_road,
     a_failure_during_a_failure_has_last_words_without_a_console) {
  Windowed recorder;
  recorder.at_print = [] {
    bail_code(1002, "second");
    Recorder::note("went on");
    bail_detail(1010, "second", BailDetail(1, "d"));
    Recorder::note("went on");
    EXPECT_FALSE(ZX_ASSERT(false));
    Recorder::note("went on");
    bailf("second");
    Recorder::note("went on");
  };
  bail_code(1012);
  Events dropped;
  for (int i = 0; i < 4; ++i) {
    dropped.emplace_back("last words Cleanup Failure");
    dropped.emplace_back("went on");
  }
  ASSERT_EQ(recorder.events.size(), 8U + 2 * dropped.size());
  EXPECT_EQ(Events(recorder.events.begin() + 4, recorder.events.begin() + 12),
            dropped);
  EXPECT_EQ(Events(recorder.events.begin() + 15, recorder.events.begin() + 23),
            dropped);
  EXPECT_EQ(recorder.events.back(), "exit 100");
}

TEST(zxatsys_road, a_failure_during_a_failure_says_nothing_on_a_console) {
  Recorder recorder;
  recorder.at_print = [] { do_mischief(); };
  bail_code(1012);
  EXPECT_EQ(recorder.events.size(), 5U);
  for (const std::string& event : recorder.events)
    EXPECT_FALSE(event.starts_with("last words")) << event;
}

// ------------------------------------------------------------- fatal_exit --

TEST(zxatsys_road, a_fatal_exit_has_last_words_and_nothing_else) {
  const struct {
    std::function<void()> call;
    const char* words;
  } rows[] = {
      {[] { fatal_exit("The disk is gone."); }, "The disk is gone."},
      {[] { fatal_exit("%s%n"); }, "%s%n"},
      {[] { fatal_exit(""); }, ""},
      {[] { fatal_exit(static_cast<const char*>(nullptr)); }, ""},
      {[] { fatal_exit(zxStr("from a string")); }, "from a string"},
      {[] { fatal_exit(zxStr()); }, ""},
  };
  for (const bool is_windowed : {false, true}) {
    for (const auto& row : rows) {
      SCOPED_TRACE(row.words);
      const Recorder recorder;
      bail_hook = note_hook;
      if (is_windowed) traits &= ~k_trait_console;
      row.call();
      EXPECT_EQ(recorder.events,
                (Events{"break", std::string("last words ") + row.words,
                        "exit at once 100"}));
      EXPECT_FALSE(bail_guard);
    }
  }
}

TEST(zxatsys_road, a_fatal_exit_works_during_a_failure) {
  Recorder recorder;
  recorder.at_exit = [] { fatal_exit("enough"); };
  bail_code(1012);
  ASSERT_EQ(recorder.events.size(), 8U);
  EXPECT_EQ(recorder.events[5], "break");
  EXPECT_EQ(recorder.events[6], "last words enough");
  EXPECT_EQ(recorder.events[7], "exit at once 100");
}

// ---------------------------------------------- emergencies, in processes --

// The table has no clear: each test of it has a process of its own.
template <char letter>
void first() {
  say(std::string_view(&std::integral_constant<char, letter>::value, 1));
}

ZX_CASE(zxatsys_road_no_emergencies) {
  start();
  run_emergency_first();
  run_emergency_second();
  bail_code(1012);
  return 0;
}

TEST(zxatsys_road, without_emergency_functions_nothing_is_called) {
  expect_end(outcome_of("zxatsys_road_no_emergencies").process,
             screen(k_message_12, k_line_12));
}

// Six pairs, some of them half or wholly empty.
bool add_six() {
  bool good = at_emergency(first<'a'>, first<'A'>) == first<'a'>;
  good &= at_emergency(nullptr, first<'B'>) == nullptr;
  good &= at_emergency(first<'c'>, nullptr) == first<'c'>;
  good &= at_emergency(nullptr, nullptr) == nullptr;
  good &= at_emergency(first<'e'>, first<'E'>) == first<'e'>;
  good &= at_emergency(first<'f'>, first<'F'>) == first<'f'>;
  return good;
}

ZX_CASE(zxatsys_road_six_emergencies) {
  start();
  if (!add_six()) say("bad result ");
  run_emergency_first();
  say(" ");
  run_emergency_second();
  say(" ");
  bail_code(1012);
  return 0;
}

TEST(zxatsys_road, six_pairs_fit_and_run_backwards_and_forwards) {
  expect_end(outcome_of("zxatsys_road_six_emergencies").process,
             "feca ABEF feca" + screen(k_message_12, k_line_12));
}

// Replaces the number behind "zxatsys:", as far as there is one.
std::string without_line_number(std::string text) {
  const std::string_view module = "zxatsys:";
  for (std::size_t at = text.find(module); at != std::string::npos;
       at = text.find(module, at)) {
    at += module.size();
    const std::size_t end = text.find_first_not_of("0123456789", at);
    if (end != at) text.replace(at, end - at, "N");
  }
  return text;
}

ZX_CASE(zxatsys_road_seventh_emergency) {
  start();
  add_six();
  at_emergency(first<'g'>, first<'G'>);
  return 0;
}

TEST(zxatsys_road, a_seventh_pair_fails_an_assertion) {
  kit::ProcessResult process =
      outcome_of("zxatsys_road_seventh_emergency").process;
  process.out = without_line_number(process.out);
  expect_end(process, "feca" + screen("1000: bailed out: zxatsys:N ",
                                      "[1000-1000-0/0-0/0/zxatsys:N/]"));
}

ZX_CASE(zxatsys_road_seventh_emergency_dropped) {
  start();
  add_six();
  bail_guard = true;
  for (int i = 0; i < 1000; ++i)
    if (at_emergency(first<'g'>, first<'G'>) != first<'g'>) say("bad result ");
  run_emergency_first();
  run_emergency_second();
  return 3;
}

TEST(zxatsys_road, a_seventh_pair_is_not_stored) {
  expect_end(outcome_of("zxatsys_road_seventh_emergency_dropped").process,
             "fecaABEF", 3);
}

// An emergency function that fails in every way stands between two others.
ZX_CASE(zxatsys_road_failing_emergency) {
  start();
  at_emergency(first<'a'>, nullptr);
  at_emergency(do_mischief, nullptr);
  at_emergency([] { oprint("printed\n"); }, nullptr);
  oprint("before\n");
  if (argc > 1)
    assert_fail(55, "zxstr");
  else
    fail_with_shared_texts();
  return 0;
}

// What is printed through the program's stream waits there until the screen
// of the failure, and comes ahead of it.
TEST(zxatsys_road, what_emergency_functions_do_leaves_the_failure_alone) {
  expect_end(
      outcome_of("zxatsys_road_failing_emergency").process,
      "abefore\r\nprinted\r\n" + screen(k_shared_message, k_shared_line));
  expect_end(
      outcome_of("zxatsys_road_failing_emergency", {"assertion"}).process,
      "abefore\r\nprinted\r\n" + screen("1000: bailed out: zxstr:55 ",
                                        "[1000-1000-0/0-0/0/zxstr:55/]"));
}

// Every step tells of itself.
void say_words(const char* word, const char* message, const char* line) {
  say(std::string(word) + "<" + message + "|" + line + ">");
}

ZX_CASE(zxatsys_road_all_steps) {
  start();
  traits &= ~k_trait_console;
  at_emergency(first<'a'>, nullptr);
  at_emergency(first<'b'>, nullptr);
  bail_hook = [](const char* message, const char* line) {
    say_words("hook", message, line);
    bail_code(1002, "hook");
  };
  bail_hooks.tell_modules = [](const char* message, const char* line) {
    say_words("modules", message, line);
  };
  zxplat::process.message_box = [](const char*, const char*, std::uint32_t) {
    say("box");
  };
  std::atexit([] { say("handler"); });
  zxplat::set_last_error(5);
  bail_code(1012);
  return 0;
}

// The two seconds are cut short here, but for that this is the real thing.
TEST(zxatsys_road, the_steps_of_a_failure_have_their_order) {
  const Outcome result = outcome_of("zxatsys_road_all_steps");
  const std::string line = "[1012-1012-0/5-0/5//]";
  const std::string both = "<" + std::string(k_message_12) + "|" + line + ">";
  const std::string told = std::string(k_message_12) + "\n" + line + "\n";
  expect_end(result.process, "bahook" + both + "modules" + both + "box" +
                                 screen(told, line) + "handler");
  EXPECT_EQ(result.box, "Cleanup Failure");
}

// ------------------------------------------------- the end, in processes --

ZX_CASE(zxatsys_road_console) {
  start();
  oprint("working");
  bail_code(1012);
  return 0;
}

TEST(zxatsys_road, a_console_program_ends_with_screen_and_dump) {
  const Outcome result = outcome_of("zxatsys_road_console");
  expect_end(result.process, "working" + screen(k_message_12, k_line_12));
  EXPECT_EQ(result.box, "");
  EXPECT_NE(result.dump.find("@ERR:1012: seek: operation failed "
                             "[1012-1012-0/0-0/0//]\r\n"),
            std::string::npos)
      << result.dump.substr(0, 300);
}

ZX_CASE(zxatsys_road_windowed) {
  start();
  traits &= ~k_trait_console;
  bail_prefix = "Oh.";
  bail_code(1010, "\xE0");
  return 0;
}

const std::string k_told_of_alef =
    "1010: close: '\x80' failed\n[1010-1010-0/0-0/0/\x80/]\n";
const std::string k_box_of_alef =
    "P FATAL ERROR (v)\n0x1010\nOh. 1010: close: '\xE0' failed\n"
    "[1010-1010-0/0-0/0/\xE0/]\nProgram Terminated.\n\n";

TEST(zxatsys_road, a_program_without_a_console_ends_with_box_screen_and_dump) {
  const Outcome result = outcome_of("zxatsys_road_windowed");
  const std::string line = "[1010-1010-0/0-0/0/\xE0/]";
  expect_end(result.process, screen(k_told_of_alef, line));
  EXPECT_EQ(result.box, k_box_of_alef);
  // The second dump replaces the first.
  EXPECT_NE(result.dump.find("@ERR:1010: close: '\x80' failed\r\n"
                             "[1010-1010-0/0-0/0/\x80/]\r\n " +
                             line + "\r\n"),
            std::string::npos)
      << result.dump.substr(0, 300);
}

TEST(zxatsys_road, a_box_can_go_to_standard_error) {
  const kit::TempDir folder;
  kit::ProcessOptions options;
  options.directory = folder.path();
  options.variables = {{"ZX_BOX_OUT", "-"}};
  const kit::ProcessResult result =
      kit::run_case("zxatsys_road_windowed", {}, options);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out, screen(k_told_of_alef, "[1010-1010-0/0-0/0/\xE0/]"));
  EXPECT_EQ(result.err, k_box_of_alef);
}

ZX_CASE(zxatsys_road_fails_again_in_handler) {
  start();
  if (argc > 1) traits &= ~k_trait_console;
  std::atexit([] { say("last"); });
  std::atexit([] {
    bail_code(1013);
    say("went on ");
    EXPECT_FALSE(ZX_ASSERT(false));
    say("to the end ");
  });
  bail_code(1012);
  return 0;
}

TEST(zxatsys_road, a_second_failure_in_an_exit_handler_lets_it_carry_on) {
  const Outcome console = outcome_of("zxatsys_road_fails_again_in_handler");
  expect_end(console.process,
             screen(k_message_12, k_line_12) + "went on to the end last");
  EXPECT_EQ(console.box, "");
  const Outcome windowed =
      outcome_of("zxatsys_road_fails_again_in_handler", {"windowed"});
  const std::string told = std::string(k_message_12) + "\n" + k_line_12 + "\n";
  expect_end(windowed.process,
             screen(told, k_line_12) + "went on to the end last");
  EXPECT_EQ(windowed.box, "P FATAL ERROR (v)\n0x1010\n " + told +
                              "Program Terminated.\n\n"
                              "Cleanup FailureCleanup Failure");
}

ZX_CASE(zxatsys_road_fails_first_in_handler) {
  start();
  std::atexit([] { say("last"); });
  std::atexit([] {
    bail_code(1012);
    say("not here");
  });
  return 7;
}

ZX_CASE(zxatsys_road_exits_in_handler) {
  start();
  std::atexit([] { say("last"); });
  std::atexit([] {
    say("handler ");
    std::exit(7);
  });
  bail_code(1012);
  return 0;
}

// The same without a failure.
ZX_CASE(zxatsys_road_only_exits_in_handler) {
  std::atexit([] { say("last"); });
  std::atexit([] { std::exit(7); });
  return 0;
}

// Whether the run time carries out the exit handlers that are left when one
// of them asks for the end of the process.
bool handlers_left_are_run() {
  const kit::ProcessResult process =
      outcome_of("zxatsys_road_only_exits_in_handler").process;
  EXPECT_EQ(process.exit_code, 7);
  return process.out == "last";
}

TEST(zxatsys_road, a_first_failure_in_an_exit_handler_ends_the_process) {
  expect_end(outcome_of("zxatsys_road_fails_first_in_handler").process,
             screen(k_message_12, k_line_12) +
                 (handlers_left_are_run() ? "last" : ""));
}

TEST(zxatsys_road, an_exit_handler_can_choose_another_exit_code) {
  expect_end(outcome_of("zxatsys_road_exits_in_handler").process,
             screen(k_message_12, k_line_12) + "handler " +
                 (handlers_left_are_run() ? "last" : ""),
             7);
}

// Fails in its destructor, if the process carries out that case.
class FailsLate {
 public:
  explicit FailsLate(const char* case_name)
      : fails(kit::wanted_case() == case_name) {}
  ~FailsLate() {
    if (!fails) return;
    zxplat::set_last_error(0);
    bail_code(1012);
    say("not here");
  }
  FailsLate(const FailsLate&) = delete;
  FailsLate& operator=(const FailsLate&) = delete;

 private:
  const bool fails;
};
const FailsLate fails_late("zxatsys_road_static_destructor");

ZX_CASE(zxatsys_road_static_destructor) {
  start();
  return 7;
}

ZX_CASE(zxatsys_road_local_static_destructor) {
  start();
  static const FailsLate late("zxatsys_road_local_static_destructor");
  return 7;
}

// Objects older than the library's start go behind its end, younger ones
// ahead of it.
TEST(zxatsys_road, a_failure_in_a_static_destructor_ends_the_process) {
  expect_end(outcome_of("zxatsys_road_static_destructor").process,
             "\r\n  Fatal Error 1012: seek: operation failed "
             "[1012-1012-0/0-0/0//]\r\n");
  expect_end(outcome_of("zxatsys_road_local_static_destructor").process,
             screen(k_message_12, k_line_12));
}

ZX_CASE(zxatsys_road_fatal_exit) {
  start();
  std::atexit([] { say("handler"); });
  bail_hook = [](const char*, const char*) { say("hook"); };
  at_emergency(first<'a'>, nullptr);
  oprint("lost");
  fatal_exit("The disk is gone.");
  return 0;
}

TEST(zxatsys_road, a_fatal_exit_ends_the_process_at_once) {
  const Outcome result = outcome_of("zxatsys_road_fatal_exit");
  expect_end(result.process, "");
  EXPECT_EQ(result.box, "The disk is gone.");
  EXPECT_EQ(result.dump, "");
}

}  // namespace
