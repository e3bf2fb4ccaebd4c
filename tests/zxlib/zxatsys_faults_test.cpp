// zxatsys_faults_test.cpp - tests of hardware faults and of errors of
// mathematical functions as failures (zxlib/zxatsys_faults.cpp).

#include <gtest/gtest.h>

#include <algorithm>
#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "kit/target.h"
#include "zxatsys.h"
#include "zxatsys_impl.h"
#include "zxplat.h"

namespace {

using kit::expect_end;
using kit::Outcome;
using kit::outcome_of;
using kit::say;
using kit::screen;
using kit::start;

// ------------------------------------------------------------- math_error --

TEST(zxatsys_faults, an_underflow_is_accepted_as_0) {
  zxMathError record = {4, "exp", 1.5, 2.5, 3.5};
  EXPECT_EQ(math_error(record), 1);
  EXPECT_EQ(record.result, 0);
  EXPECT_EQ(record.type, 4);
  EXPECT_STREQ(record.name, "exp");
  EXPECT_EQ(record.arg1, 1.5);
  EXPECT_EQ(record.arg2, 2.5);
  kit::with_failures_dropped([&] {
    record.result = 3.5;
    EXPECT_EQ(math_error(record), 1);
    EXPECT_EQ(record.result, 0);
  });
}

TEST(zxatsys_faults, any_other_error_of_a_function_is_message_3004) {
  const struct {
    std::int32_t type;
    const char* name;
    std::string added;
    std::string line;
  } rows[] = {
      {1, "sqrt", " (1: sqrt)", "[3004-3004-1/E-0/E//sqrt]"},
      {2, "log", " (2: log)", "[3004-3004-2/E-0/E//log]"},
      {3, "exp", " (3: exp)", "[3004-3004-3/E-0/E//exp]"},
      {5, "sin", " (5: sin)", "[3004-3004-5/E-0/E//sin]"},
      {6, "%s%n", " (6: %s%n)", "[3004-3004-6/E-0/E//%s%n]"},
      {0, "pow", " (pow)", "[3004-3004-0/E-0/E//pow]"},
      {-4, "pow", " (-4: pow)", "[3004-3004--4/E-0/E//pow]"},
      {1, nullptr, " (1)", "[3004-3004-1/E-0/E//]"},
      {1, "", " (1)", "[3004-3004-1/E-0/E//]"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.added);
    zxMathError record = {row.type, row.name, 1.5, 2.5, 3.5};
    EXPECT_FAILURE(math_error(record), "3004: math func" + row.added, row.line);
    kit::with_failures_dropped([&] { EXPECT_EQ(math_error(record), 0); });
    EXPECT_EQ(record.result, 3.5);
  }
}

// -------------------------------------------------- ways to make a fault --

// The sanitizers would find these ahead of the processor.
#define UNCHECKED [[gnu::noipa, gnu::no_sanitize("address", "undefined")]]

volatile int zero = 0;
volatile int dividend = 100;
volatile int int_result;
volatile double double_zero = 0;
volatile double double_large = 1e300;
volatile double double_small = 1e-300;
volatile double double_result;
volatile long double long_zero = 0;
volatile long double long_large = 1e4000L;
volatile long double long_result;
int* volatile nowhere = nullptr;

UNCHECKED void write_to_null() { *static_cast<volatile int*>(nowhere) = 1; }
UNCHECKED void read_from_null() {
  int_result = *static_cast<volatile int*>(nowhere);
}
UNCHECKED void run_into_a_trap() { __builtin_trap(); }
UNCHECKED void divide_whole_numbers() { int_result = dividend / zero; }
UNCHECKED void divide_doubles() { double_result = 1 / double_zero; }
UNCHECKED void divide_long_doubles() { long_result = 1 / long_zero; }
UNCHECKED void overflow_doubles() {
  double_result = double_large * double_large;
}
UNCHECKED void overflow_long_doubles() {
  long_result = long_large * long_large;
}
UNCHECKED void divide_double_zeros() {
  double_result = double_zero / double_zero;
}
UNCHECKED void divide_long_double_zeros() {
  long_result = long_zero / long_zero;
}
UNCHECKED void underflow_doubles() {
  double_result = double_small * double_small;
}

// Without end, as far as the compiler can tell.
UNCHECKED int fill_the_stack(int depth) {
  volatile char room[2000];
  room[0] = static_cast<char>(depth);
  if (zero != 0) return 0;
  return fill_the_stack(depth + 1) + room[0];
}
void exhaust_the_stack() { fill_the_stack(0); }

void send_arithmetic() { std::raise(SIGFPE); }
void send_illegal() { std::raise(SIGILL); }
void send_bad_address() { std::raise(SIGSEGV); }

using Action = void (*)();

struct Way {
  const char* name;
  Action action;
};
constexpr Way k_ways[] = {
    {"write to null", write_to_null},
    {"read from null", read_from_null},
    {"trap", run_into_a_trap},
    {"divide whole numbers", divide_whole_numbers},
    {"divide doubles", divide_doubles},
    {"divide long doubles", divide_long_doubles},
    {"overflow doubles", overflow_doubles},
    {"overflow long doubles", overflow_long_doubles},
    {"divide double zeros", divide_double_zeros},
    {"divide long double zeros", divide_long_double_zeros},
    {"underflow doubles", underflow_doubles},
    {"exhaust the stack", exhaust_the_stack},
    {"send arithmetic", send_arithmetic},
    {"send illegal", send_illegal},
    {"send bad address", send_bad_address},
};

// What a case is to do: the way that its argument names.
Action wanted_action(char** argv) {
  for (const Way& way : k_ways)
    if (way.name == std::string_view(argv[1])) return way.action;
  return nullptr;
}

// -------------------------------------------------------- faults, for real --

// What stands in the stack above the action, which may have no frame of its
// own.
UNCHECKED void call(Action action) {
  action();
  int_result = 0;
}
UNCHECKED void carry_out(Action action) {
  call(action);
  int_result = 0;
}

std::string text_of(Action action) {
  return std::to_string(reinterpret_cast<std::uintptr_t>(action));
}

// Says where the action lies, and what calls it, and does it.
ZX_CASE(zxatsys_faults) {
  start();
  install_fault_handlers();
  if (argc > 2 && !kit::trap_float_errors()) return 9;
  const Action action = wanted_action(argv);
  say(text_of(action) + " " + text_of(reinterpret_cast<Action>(carry_out)) +
      ";");
  zxplat::set_last_error(0);
  carry_out(action);
  return 7;
}

// The head of a frame in a dump: the address and the frame pointer.
struct FrameHead {
  std::uint64_t address = 0;
  std::uint64_t frame = 0;
};

std::vector<FrameHead> frames_of(const std::string& dump) {
  const std::string_view head = "------ ret @ADDR ";
  const std::string_view between = "   BP: ";
  const std::size_t digits = 2 * sizeof(void*);
  std::vector<FrameHead> frames;
  for (std::size_t at = dump.find(head); at != std::string::npos;
       at = dump.find(head, at + 1)) {
    const std::size_t from = at + head.size();
    EXPECT_EQ(dump.substr(from + digits, between.size()), between);
    const auto number = [&](std::size_t place) {
      return std::stoull(dump.substr(place, digits), nullptr, 16);
    };
    frames.push_back({number(from), number(from + digits + between.size())});
  }
  return frames;
}

// True if the address lies in a small function.
bool is_within(std::uint64_t address, std::uint64_t function) {
  return address >= function && address < function + 100;
}

bool walks_past(const std::vector<FrameHead>& frames, std::uint64_t function) {
  return std::any_of(frames.begin(), frames.end(), [&](const FrameHead& frame) {
    return is_within(frame.address, function);
  });
}

struct FaultOutcome {
  kit::ProcessResult process;  // its output without what the case says first
  std::vector<FrameHead> frames;
  std::string dump;
  std::uint64_t action = 0;  // where the two functions lie
  std::uint64_t caller = 0;
};

FaultOutcome fault_by(const std::string& way,
                      const std::vector<std::string>& more = {}) {
  std::vector<std::string> arguments = {way};
  arguments.insert(arguments.end(), more.begin(), more.end());
  const Outcome outcome = outcome_of("zxatsys_faults", arguments);
  FaultOutcome result = {outcome.process, frames_of(outcome.dump),
                         outcome.dump};
  std::string& out = result.process.out;
  const std::size_t end = out.find(';');
  if (end == std::string::npos) return result;
  result.action = std::stoull(out);
  result.caller = std::stoull(out.substr(out.find(' ')));
  out.erase(0, end + 1);
  return result;
}

TEST(zxatsys_faults, a_bad_instruction_or_address_is_message_1001) {
  const struct {
    const char* way;
    int detail;
  } rows[] = {
      {"write to null", 1101},
      {"read from null", 1101},
      {"trap", 402},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.way);
    const std::string number = std::to_string(row.detail);
    const FaultOutcome outcome = fault_by(row.way);
    expect_end(outcome.process, screen("1001: exception (" + number + ")",
                                       "[1001-1001-" + number + "/0-0/0//]"));
    EXPECT_NE(outcome.dump.find("@ERR:1001: exception (" + number + ") "),
              std::string::npos);
    ASSERT_GE(outcome.frames.size(), 2U);
    EXPECT_TRUE(is_within(outcome.frames[0].address, outcome.action));
    EXPECT_NE(outcome.frames[0].frame, 0U);
    // The walk goes on from there.
    EXPECT_TRUE(walks_past(outcome.frames, outcome.caller));
  }
}

TEST(zxatsys_faults, a_whole_number_divided_by_0_is_message_3000) {
  const FaultOutcome outcome = fault_by("divide whole numbers");
  expect_end(outcome.process,
             screen("3000: general math err (829=NAN/bad op 835=flt stk "
                    "ovrflow) (801)",
                    "[3000-3000-801/0-0/0//]"));
  EXPECT_NE(outcome.dump.find("@ERR:3000: "), std::string::npos);
  // The dump walks up from the failure, past the place of the fault.
  EXPECT_TRUE(walks_past(outcome.frames, outcome.caller));
}

TEST(zxatsys_faults, an_exhausted_stack_is_message_1001) {
  const FaultOutcome outcome = fault_by("exhaust the stack");
  expect_end(outcome.process,
             screen("1001: exception (1101)", "[1001-1001-1101/0-0/0//]"));
  ASSERT_FALSE(outcome.frames.empty());
  EXPECT_NE(outcome.frames[0].address, 0U);
  EXPECT_NE(outcome.frames[0].frame, 0U);
}

TEST(zxatsys_faults, a_signal_that_was_sent_has_the_sub_code_50) {
  const struct {
    const char* way;
    std::string message;
    std::string line;
  } rows[] = {
      {"send arithmetic",
       "3000: general math err (829=NAN/bad op 835=flt stk ovrflow) (850)",
       "[3000-3000-850/0-0/0//]"},
      {"send illegal", "1001: exception (450)", "[1001-1001-450/0-0/0//]"},
      {"send bad address", "1001: exception (1150)",
       "[1001-1001-1150/0-0/0//]"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.way);
    const FaultOutcome outcome = fault_by(row.way);
    expect_end(outcome.process, screen(row.message, row.line));
    EXPECT_NE(outcome.dump.find("@ERR:" + row.message.substr(0, 5)),
              std::string::npos);
  }
}

struct FloatRow {
  const char* way;
  std::string message;
  std::string line;
};

FloatRow float_row(const char* way, const std::string& number,
                   const std::string& words, const std::string& detail = "") {
  return {way,
          number + ": " + words + (detail.empty() ? "" : " (" + detail + ")"),
          "[" + number + "-" + number + "-" + (detail.empty() ? "0" : detail) +
              "/0-0/0//]"};
}

constexpr char k_general[] =
    "general math err (829=NAN/bad op 835=flt stk ovrflow)";

// False if floating-point numbers make no faults here.
bool expect_float_faults(const std::vector<FloatRow>& rows) {
  for (const FloatRow& row : rows) {
    SCOPED_TRACE(row.way);
    const FaultOutcome outcome = fault_by(row.way, {"trap"});
    if (outcome.process.exit_code == 9) return false;
    expect_end(outcome.process, screen(row.message, row.line));
  }
  return true;
}

constexpr char k_no_traps[] = "floating-point numbers make no faults here";

TEST(zxatsys_faults, errors_of_double_numbers_have_their_messages) {
  if (!expect_float_faults(
          {float_row("divide doubles", "3002", "float div by zero"),
           float_row("overflow doubles", "3003", "float ovrflow"),
           float_row("divide double zeros", "3000", k_general, "829"),
           float_row("underflow doubles", "3000", k_general, "833")}))
    GTEST_SKIP() << k_no_traps;
}

// Another unit of the processor works on these.
TEST(zxatsys_faults, errors_of_long_double_numbers_have_their_messages) {
  if (!expect_float_faults(
          {float_row("divide long doubles", "3002", "float div by zero"),
           float_row("overflow long doubles", "3003", "float ovrflow"),
           float_row("divide long double zeros", "3000", k_general, "829")}))
    GTEST_SKIP() << k_no_traps;
}

TEST(zxatsys_faults, untrapped_floating_point_errors_are_none) {
  for (const char* way : {"divide doubles", "overflow doubles",
                          "divide double zeros", "underflow doubles"}) {
    EXPECT_EQ(fault_by(way).process.exit_code, 7) << way;
  }
}

void say_mine(int) { say("mine"); }

ZX_CASE(zxatsys_faults_installed_twice) {
  start();
  install_fault_handlers();
  for (const int number : {SIGSEGV, SIGILL, SIGFPE})
    std::signal(number, say_mine);
  install_fault_handlers();
  for (const int number : {SIGSEGV, SIGILL, SIGFPE}) std::raise(number);
  return 7;
}

TEST(zxatsys_faults, a_second_installation_does_nothing) {
  expect_end(outcome_of("zxatsys_faults_installed_twice").process,
             "mineminemine", 7);
}

// -------------------------------------------------- faults during failures --

Action late_action = nullptr;

void act_late() {
  say("act ");
  late_action();
  say("went on ");
}

ZX_CASE(zxatsys_faults_in_emergency) {
  start();
  install_fault_handlers();
  late_action = wanted_action(argv);
  at_emergency(act_late, nullptr);
  zxplat::set_last_error(0);
  argc > 2 ? run_into_a_trap() : bail_code(1012);
  return 7;
}

ZX_CASE(zxatsys_faults_in_exit_handler) {
  start();
  if (argc > 2) traits &= ~k_trait_console;
  install_fault_handlers();
  late_action = wanted_action(argv);
  std::atexit([] { say("last"); });
  std::atexit(act_late);
  zxplat::set_last_error(0);
  bail_code(1012);
  return 7;
}

// True if the system ended the process, natively by this signal.
bool ended_by(const kit::ProcessResult& process, int number) {
  if (process.timed_out) return false;
  if (kit::on_windows())
    return process.exit_code != 0 && process.exit_code != 7 &&
           process.exit_code != 100;
  return process.exit_code == -number;
}

const std::string k_screen_12 =
    screen("1012: seek: operation failed", "[1012-1012-0/0-0/0//]");

TEST(zxatsys_faults, a_fault_during_a_failure_ends_the_process_by_the_system) {
  const struct {
    const char* way;
    int number;
  } rows[] = {
      {"write to null", 11},
      {"trap", 4},
      {"divide whole numbers", 8},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.way);
    const kit::ProcessResult first =
        outcome_of("zxatsys_faults_in_emergency", {row.way}).process;
    EXPECT_TRUE(ended_by(first, row.number)) << first.exit_code;
    EXPECT_EQ(first.out, "act ");
    const kit::ProcessResult late =
        outcome_of("zxatsys_faults_in_exit_handler", {row.way}).process;
    EXPECT_TRUE(ended_by(late, row.number)) << late.exit_code;
    EXPECT_EQ(late.out, k_screen_12 + "act ");
    // The failure is itself a fault, of the same kind or another.
    const kit::ProcessResult second =
        outcome_of("zxatsys_faults_in_emergency", {row.way, "fault"}).process;
    EXPECT_TRUE(ended_by(second, row.number)) << second.exit_code;
    EXPECT_EQ(second.out, "act ");
  }
}

// There is nothing to end the process for: nobody tries the signal again.
TEST(zxatsys_faults, a_signal_sent_during_a_failure_is_passed_over) {
  for (const char* way :
       {"send arithmetic", "send illegal", "send bad address"}) {
    SCOPED_TRACE(way);
    expect_end(outcome_of("zxatsys_faults_in_emergency", {way}).process,
               "act went on " + k_screen_12);
    expect_end(outcome_of("zxatsys_faults_in_exit_handler", {way}).process,
               k_screen_12 + "act went on last");
  }
}

// It is not even a failure that would be dropped.
TEST(zxatsys_faults, a_signal_sent_during_a_failure_has_no_last_words) {
  for (const char* way : {"send arithmetic", "send bad address"}) {
    SCOPED_TRACE(way);
    const Outcome outcome =
        outcome_of("zxatsys_faults_in_exit_handler", {way, "windowed"});
    EXPECT_EQ(outcome.process.exit_code, 100);
    EXPECT_TRUE(outcome.process.out.ends_with("act went on last"));
    EXPECT_EQ(outcome.box,
              "P FATAL ERROR (v)\n0x1010\n 1012: seek: operation failed\n"
              "[1012-1012-0/0-0/0//]\nProgram Terminated.\n\n");
  }
}

}  // namespace
