// failure.cpp - running statements that must fail.
#include "kit/failure.h"

#include <algorithm>
#include <cctype>
#include <csetjmp>
#include <string_view>

#include "zxatsys.h"
#include "zxatsys_impl.h"
#include "zxplat.h"

#ifdef __SANITIZE_ADDRESS__
#include <sanitizer/lsan_interface.h>
#else
static void __lsan_disable() {}
static void __lsan_enable() {}
#endif

namespace kit {
namespace {

std::jmp_buf way_out;
int exit_code_seen = 0;
std::string printed;
std::vector<std::string> dumped;

void leave(int code) {
  exit_code_seen = code;
  std::longjmp(way_out, 1);
}

void catch_print(std::string_view text) { printed += text; }

void catch_dump(std::uint32_t check, const char* text) {
  EXPECT_EQ(check, 0x1234u);
  dumped.emplace_back(text);
}

// Puts the seams in place and takes them out again.  What a statement that
// is jumped out of had allocated is lost, and no leak of the library.
class Seams {
 public:
  Seams() {
    bail_hooks.program_path = [] { return k_shown_path; };
    bail_hooks.program_name = [] { return k_shown_name; };
    bail_hooks.program_version = [] { return k_shown_version; };
    bail_hooks.print = catch_print;
    bail_hooks.dump = catch_dump;
    bail_wait_seconds = 0;
    zxplat::process.exit = leave;
    printed.clear();
    dumped.clear();
    exit_code_seen = 0;
    __lsan_disable();
  }
  ~Seams() {
    __lsan_enable();
    bail_hooks = old_hooks;
    bail_wait_seconds = old_wait;
    zxplat::process.exit = old_exit;
    bail_guard = false;
  }

 private:
  BailHooks old_hooks = bail_hooks;
  std::int64_t old_wait = bail_wait_seconds;
  void (*old_exit)(int) = zxplat::process.exit;
};

// True if the statement came back.
bool comes_back(const std::function<void()>& statement) {
  if (setjmp(way_out) != 0) return false;
  statement();
  return true;
}

// Replaces the two numbers of the system, which stand between the first and
// the third slash as "2-0/2", by "E".
std::string without_system_numbers(const std::string& line) {
  const std::size_t first = line.find('/');
  const std::size_t third = line.find('/', line.find('/', first + 1) + 1);
  return line.substr(0, first) + "/E-0/E" + line.substr(third);
}

// Cuts the screen into message and line.
void take_apart(Failure& failure) {
  constexpr std::string_view k_start = "\r\nprog v1 Fatal Error ";
  constexpr std::string_view k_new_line = "\r\n           ";
  std::string_view text = failure.screen;
  if (!text.starts_with(k_start) || !text.ends_with("]\r\n")) return;
  text.remove_prefix(k_start.size());
  text.remove_suffix(2);
  // The line's own texts may hold a bracket, its start never does.
  const std::size_t line = text.find_last_of('[');
  if (line == std::string_view::npos) return;
  failure.line = without_system_numbers(std::string(text.substr(line)));
  text = text.substr(0, line);
  text.remove_suffix(text.ends_with(k_new_line) ? k_new_line.size() : 1);
  failure.message = text;
}

bool is_number(std::string_view text) {
  return !text.empty() &&
         std::all_of(text.begin(), text.end(),
                     [](unsigned char c) { return std::isdigit(c) != 0; });
}

}  // namespace

Failure failure_of(const std::function<void()>& statement) {
  const Seams seams;
  Failure failure;
  failure.failed = !comes_back(statement);
  failure.exit_code = exit_code_seen;
  failure.screen = printed;
  failure.dumps = dumped;
  take_apart(failure);
  return failure;
}

void with_failures_dropped(const std::function<void()>& statement) {
  struct Guard {
    Guard() { bail_guard = true; }
    ~Guard() { bail_guard = false; }
  };
  const Guard guard;
  statement();
}

testing::AssertionResult is_assertion_of(const Failure& failure,
                                         const std::string& module) {
  const std::string start = "1000: bailed out: " + module + ":";
  std::string_view rest = failure.message;
  if (failure.failed && failure.exit_code == 100 && rest.starts_with(start) &&
      rest.ends_with(' ') &&
      is_number(rest.substr(start.size(), rest.size() - start.size() - 1)))
    return testing::AssertionSuccess();
  return testing::AssertionFailure()
         << "no assertion of " << module << ": "
         << (failure.failed ? "'" + failure.message + "'" : "came back");
}

std::string line_of(int number, const std::string& text,
                    const BailDetail& detail) {
  const std::string n = std::to_string(number);
  return "[" + n + "-" + n + "-" + std::to_string(detail.number) + "/E-0/E/" +
         text.substr(0, 12) + "/" +
         (detail.text != nullptr ? detail.text : "") + "]";
}

void expect_assertion_at(const std::function<void()>& statement,
                         const std::string& position) {
  EXPECT_FAILURE(statement(), "1000: bailed out: " + position + " ",
                 line_of(1000, position));
}

}  // namespace kit
