// failure_road.h - the test kit: what the tests of the whole road of a failure
// share: a recorder in the place of the system, and cases that fail for real.
#ifndef KIT_FAILURE_ROAD_H
#define KIT_FAILURE_ROAD_H

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <functional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/cases.h"
#include "kit/tempdir.h"
#include "zxatsys.h"
#include "zxatsys_impl.h"
#include "zxmainf.h"
#include "zxplat.h"

namespace kit {

// Puts recorders in the place of print, dump, boxes, debugger, clock, sleep
// and process exit, which comes back here.  Time passes by a millisecond with
// each look at the clock and by what is slept.  The program's hooks and
// traits may be changed while one lives; they come back at its end.
class Recorder {
 public:
  explicit Recorder(std::int64_t start_ms = 0) : now_ms(start_ms) {
    self = this;
    bail_hooks.program_path = [] { return "path"; };
    bail_hooks.program_name = [] { return "NAME"; };
    bail_hooks.program_version = [] { return "vers"; };
    bail_hooks.print = print;
    bail_hooks.dump = dump;
    zxplat::process.exit = leave;
    zxplat::process.exit_at_once = leave_at_once;
    zxplat::process.message_box = message_box;
    zxplat::process.last_words = last_words;
    zxplat::process.debug_break = [] { note("break"); };
    zxplat::process.clock = clock;
    zxplat::process.sleep = sleep;
  }
  ~Recorder() {
    bail_hooks = old_hooks;
    bail_hook = old_hook;
    bail_hook_early = old_hook_early;
    bail_prefix = old_prefix;
    traits = old_traits;
    zxplat::process = old_process;
    bail_guard = false;
  }
  Recorder(const Recorder&) = delete;
  Recorder& operator=(const Recorder&) = delete;

  // For hooks of a test, which have no other way to the recorder.
  static void note(const std::string& event) {
    self->events.push_back(event);
    self->event_seconds.push_back(self->now_ms / 1000);
  }

  std::vector<std::string> events;
  std::vector<std::int64_t> event_seconds;
  std::function<void()> at_print;
  std::function<void()> at_exit;
  bool slept = false;

 private:
  static void print(std::string_view text) {
    note("print " + std::string(text));
    if (self->at_print) self->at_print();
  }
  static void dump(std::uint32_t check, const char* message) {
    EXPECT_EQ(check, 0x1234U);
    note("dump " + std::string(message));
  }
  static void message_box(const char* text, const char* caption,
                          std::uint32_t style) {
    note("box " + std::to_string(style) + " " + caption + ": " + text);
  }
  static void last_words(const char* text) {
    note("last words " + std::string(text));
  }
  static void leave(int code) {
    note("exit " + std::to_string(code));
    if (self->at_exit) self->at_exit();
  }
  static void leave_at_once(int code) {
    note("exit at once " + std::to_string(code));
  }
  static std::int64_t clock() {
    self->now_ms += 1;
    return self->now_ms / 1000;
  }
  static void sleep(std::uint32_t milliseconds) {
    self->now_ms += milliseconds;
    self->slept = true;
  }

  inline static Recorder* self = nullptr;
  std::int64_t now_ms;
  BailHooks old_hooks = bail_hooks;
  zxBailHook old_hook = bail_hook;
  zxBailHook old_hook_early = bail_hook_early;
  const char* old_prefix = bail_prefix;
  std::uint32_t old_traits = traits;
  zxplat::ProcessCalls old_process = zxplat::process;
};

// ---- cases that fail for real

// Starts the library in a case as the program "p" of version "v", whose
// failures do not wait for a reader.
inline void start() {
  static const char* const arguments[] = {"p"};
  bail_wait_seconds = 0;
  program_version_text = "v";
  init_zxlib_args(1, arguments);
  zxplat::set_last_error(0);
}

// Writes behind everything else that the program does, streams or none.
inline void say(std::string_view text) {
  zxplat::files.write(zxplat::k_stdout_fd, text.data(), text.size());
}

// What such a program prints.
inline std::string screen(const std::string& message, const std::string& line) {
  const bool short_enough = message.size() + line.size() < 65;
  return "\r\np v Fatal Error " + message +
         (short_enough ? " " : "\r\n           ") + line + "\r\n";
}

// A case carried out in a folder of its own.
struct Outcome {
  kit::ProcessResult process;
  std::string dump;  // the stack dump file; empty if there is none
  std::string box;   // what went to message boxes
};

// The case's boxes go to a file.
inline Outcome outcome_of(const std::string& name,
                          const std::vector<std::string>& arguments = {}) {
  const kit::TempDir folder;
  const std::string box = folder.file("box");
  const std::string dump = folder.file("P.dmp");
  kit::ProcessOptions options;
  options.directory = folder.path();
  options.variables = {{"ZX_BOX_OUT", box}};
  Outcome result;
  result.process = kit::run_case(name, arguments, options);
  if (std::filesystem::exists(box)) result.box = kit::read_file(box);
  if (std::filesystem::exists(dump)) result.dump = kit::read_file(dump);
  return result;
}

// That a case failed as it should, with these last words on its screen.
inline void expect_end(const kit::ProcessResult& process,
                       const std::string& out, int exit_code = 100) {
  EXPECT_FALSE(process.timed_out);
  EXPECT_EQ(process.exit_code, exit_code);
  EXPECT_EQ(process.out, out);
  EXPECT_EQ(process.err, "");
}

}  // namespace kit

#endif  // KIT_FAILURE_ROAD_H
