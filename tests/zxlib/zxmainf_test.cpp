// zxmainf_test.cpp - start-up and shutdown: the values of the process, the
// standard streams, the order of the end, and failing at each of its stages.
// Nearly all of it can happen once in a process, hence the cases.
// Tests zxlib/zxmainf.h, zxmainf.cpp and zxmainf_version_text.cpp.
#include "zxmainf.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/faults.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "zxatsys.h"
#include "zxplat.h"
#include "zxsfmt.h"
#include "zxsys2.h"
#include "zxusage.h"

namespace {

namespace fs = std::filesystem;

using Words = std::vector<std::string>;

// Starts with the arguments of the case as the whole command line, the path
// of the program being the first of them.
void start_with_arguments(int argc, char** argv) {
  init_zxlib_args(argc - 1, argv + 1);
}

// Writes behind everything else that the program does, streams or none.
void say(std::string_view text) {
  zxplat::files.write(zxplat::k_stdout_fd, text.data(), text.size());
}

// ---- the program's name

ZX_CASE(zxmainf_name) {
  start_with_arguments(argc, argv);
  oprint("#|#", program_path, program_name);
  return 0;
}

TEST(zxmainf, the_name_of_the_program_comes_from_its_path) {
  const struct {
    const char* path;
    const char* name;
  } rows[] = {
      {"tool", "TOOL"},
      {"tool.exe", "TOOL"},
      {"Tool.EXE", "TOOL"},
      {"tOOL.Exe", "TOOL"},
      {"tool.dll", "TOOL"},
      {"tool.DLL", "TOOL"},
      {"tool.com", "TOOL.COM"},
      {"tool.exe.exe", "TOOL.EXE"},
      {"tool.dll.exe", "TOOL.DLL"},
      {"toolexe", "TOOLEXE"},
      {"tool.exe ", "TOOL.EXE "},
      {".exe", ""},
      {"exe", "EXE"},
      {"xe", "XE"},
      {"/usr/bin/tool", "TOOL"},
      {"C:\\tools\\my tool.exe", "MY TOOL"},
      {"a/b\\c.exe", "C"},
      {"a\\b/c.exe", "C"},
      {"C:tool.exe", "TOOL"},
      {"dir.exe\\", ""},
      {"dir.exe/x", "X"},
      {"", ""},
      {"abcdefghijklmnopqrstuvwxyzabcd", "ABCDEFGHIJKLMNOPQRST"},
      {"abcdefghijklmnopqrstuvwxyz.exe", "ABCDEFGHIJKLMNOPQRST"},
      {"abcdefghijklmnopqrst", "ABCDEFGHIJKLMNOPQRST"},
      {"abcdefghijklmnopqrstu", "ABCDEFGHIJKLMNOPQRST"},
      {"abcdefghijklmnopqrs.exe", "ABCDEFGHIJKLMNOPQRS"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.path);
    const auto result = kit::run_case("zxmainf_name", {row.path});
    EXPECT_EQ(result.exit_code, 0);
    EXPECT_EQ(result.out, row.path + std::string("|") + row.name);
  }
}

ZX_CASE(zxmainf_hebrew_name) {
  const char* arguments[] = {"\xE0\\a\xE0\xFAz.exe"};
  init_zxlib_args(1, arguments);
  oprint("#", program_name);
  return 0;
}

TEST(zxmainf, ascii_letters_alone_have_an_upper_case) {
  EXPECT_EQ(kit::run_case("zxmainf_hebrew_name").out, "A\xE0\xFAZ");
}

ZX_CASE(zxmainf_no_arguments) {
  init_zxlib_args(0, nullptr);
  oprint("<#|#|#>", program_path, program_name, g_args.length());
  return 0;
}

ZX_CASE(zxmainf_null_argument) {
  const char* arguments[] = {nullptr};
  init_zxlib_args(1, arguments);
  oprint("<#|#|#>", program_path, program_name, g_args.length());
  return 0;
}

ZX_CASE(zxmainf_null_list) {
  const char* arguments[] = {nullptr};
  init_zxlib_args(0, arguments);
  oprint("<#|#|#>", program_path, program_name, g_args.length());
  return 0;
}

TEST(zxmainf, without_a_program_name_the_texts_are_empty) {
  for (const char* name :
       {"zxmainf_no_arguments", "zxmainf_null_argument", "zxmainf_null_list"}) {
    SCOPED_TRACE(name);
    const auto result = kit::run_case(name);
    EXPECT_EQ(result.exit_code, 0);
    EXPECT_EQ(result.out, "<||0>");
  }
}

// ---- the version

ZX_CASE(zxmainf_version) {
  program_version_text = argc > 1 ? argv[1] : nullptr;
  init_zxlib_args(1, argv);
  oprint("<#>", program_version);
  return 0;
}

TEST(zxmainf, the_version_is_the_applications_or_v0) {
  EXPECT_EQ(kit::run_case("zxmainf_version").out, "<v0>");
  EXPECT_EQ(kit::run_case("zxmainf_version", {"1.01a"}).out, "<1.01a>");
  EXPECT_EQ(kit::run_case("zxmainf_version", {""}).out, "<>");
}

// ---- the working directory

ZX_CASE(zxmainf_directory) {
  init_zxlib_args(argc, argv);
  oprint("#", current_dir);
  return 0;
}

std::string with_backslashes(std::string path) {
  std::replace(path.begin(), path.end(), '/', '\\');
  return path;
}

TEST(zxmainf, the_working_directory_at_the_start_ends_in_a_backslash) {
  const kit::TempDir folder;
  kit::ProcessOptions options;
  options.directory = folder.path();
  EXPECT_EQ(kit::run_case("zxmainf_directory", {}, options).out,
            with_backslashes(fs::canonical(folder.path()).string()) + "\\");
}

TEST(zxmainf, the_root_is_a_directory_that_has_its_backslash) {
  kit::ProcessOptions options;
  options.directory = fs::current_path().root_path().string();
  EXPECT_EQ(kit::run_case("zxmainf_directory", {}, options).out,
            with_backslashes(options.directory));
}

// ---- the arguments

ZX_CASE(zxmainf_arguments) {
  init_zxlib_args(argc, argv);
  for (std::int32_t i = 0; i < g_args.length(); ++i)
    oprint("<#>", g_args.get(i));
  oprint("|#|#|#", positional_arg(0), positional_arg(1), positional_arg(-1));
  return 0;
}

TEST(zxmainf, arguments_arrive_as_they_are) {
  EXPECT_EQ(kit::run_case("zxmainf_arguments").out, "|||");
  const Words arguments = {
      "a",  "",   "two words", "q\"uote", "b\\", "c\\\"", "*",        "?.cpp",
      "-x", "--", "$HOME",     "%PATH%",  "#1",  "tab\t", "'single'", "a  b "};
  std::string expected;
  for (const std::string& argument : arguments)
    expected += "<" + argument + ">";
  const auto result = kit::run_case("zxmainf_arguments", arguments);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, expected + "|a||");
}

TEST(zxmainf, there_may_be_many_arguments) {
  Words arguments;
  std::string expected;
  for (int i = 0; i < 1000; ++i) {
    arguments.push_back(std::to_string(i));
    expected += "<" + arguments.back() + ">";
  }
  EXPECT_EQ(kit::run_case("zxmainf_arguments", arguments).out,
            expected + "|0|1|");
}

// ---- the standard streams

TEST(zxmainf, the_standard_streams_are_bound_under_a_dash) {
  const struct {
    const zxBFile& file;
    zxplat::Fd descriptor;
  } rows[] = {{g_stdin, 0}, {g_stdout, 1}, {g_stderr, 2}};
  for (const auto& row : rows) {
    EXPECT_EQ(row.file.handle, &zx_standard_stream(row.descriptor));
    EXPECT_TRUE(row.file.name == "-");
  }
}

ZX_CASE(zxmainf_lines) {
  g_stdin.lines = g_stdout.lines = g_stderr.lines = 5;
  init_zxlib_args(argc, argv);
  oprint("# # #", g_stdin.lines, g_stdout.lines, g_stderr.lines);
  oprint(" #", g_stdout.lines);
  return 0;
}

TEST(zxmainf, the_standard_streams_start_without_lines) {
  EXPECT_EQ(kit::run_case("zxmainf_lines").out, "0 0 0 1");
}

TEST(zxmainf, a_stream_is_attached_under_a_name) {
  static zxStream stream(zxplat::k_stdin_fd);
  zxBFile file;
  file.lines = 7;
  file.attach("some name", stream);
  EXPECT_EQ(file.handle, &stream);
  EXPECT_TRUE(file.name == "some name");
  EXPECT_EQ(file.lines, 0);
  file.handle = nullptr;
}

TEST(zxmainf, a_stream_over_nothing_is_the_null_device) {
  static zxStream stream(999);
  zxBFile file;
  file.lines = 7;
  file.attach("-", stream);
  ASSERT_TRUE(file.is_open());
  EXPECT_NE(file.handle, &stream);
  EXPECT_TRUE(file.name == "nul");
  EXPECT_EQ(file.lines, 0);
  char byte = '?';
  EXPECT_FALSE(file.read(&byte, 1));
  file.puts("lost");
  EXPECT_TRUE(file.close());
}

TEST(zxmainf, without_a_null_device_the_file_stays_closed) {
  static zxStream stream(999);
  zxBFile file;
  kit::Faults faults;
  faults.fail_all(kit::Call::open);
  file.attach("-", stream);
  EXPECT_FALSE(file.is_open());
}

TEST(zxmainf, a_stream_that_cannot_be_switched_to_binary_fails_an_assertion) {
  static zxStream stream(zxplat::k_stdin_fd);
  zxBFile file;
  zxplat::files.set_mode = [](zxplat::Fd, zxplat::StreamMode) { return false; };
  EXPECT_FAILURE(file.attach("-", stream), "1000: bailed out: zxmainf:44 ",
                 "[1000-1000-0/E-0/E/zxmainf:44/]");
  kit::with_failures_dropped([&] { file.attach("-", stream); });
  zxplat::files.set_mode = zxplat::system_files.set_mode;
  EXPECT_FALSE(file.is_open());
}

ZX_CASE(zxmainf_copies_input) {
  init_zxlib_args(argc, argv);
  char room[1000];
  std::int32_t got = 0;
  while (g_stdin.read(room, sizeof room, &got)) {
    g_stdout.write(room, got);
    g_stderr.write(room, got);
  }
  return 3;
}

TEST(zxmainf, all_bytes_pass_the_standard_streams) {
  kit::ProcessOptions options;
  for (int round = 0; round < 300; ++round) {
    for (int byte = 0; byte < 256; ++byte)
      options.input += static_cast<char>(byte);
    options.input += "\r\n\n\r\x1A";
  }
  const auto result = kit::run_case("zxmainf_copies_input", {}, options);
  EXPECT_EQ(result.exit_code, 3);
  EXPECT_TRUE(result.out == options.input);
  EXPECT_TRUE(result.err == options.input);
}

// Ends without any handler: what waits in a buffer is lost.
ZX_CASE(zxmainf_is_cut_off) {
  init_zxlib_args(argc, argv);
  oprint("output ");
  eprint("errors ");
  oprint("output");
  eprint("errors");
  std::_Exit(4);
}

TEST(zxmainf, standard_error_is_written_at_once_and_output_waits) {
  const auto result = kit::run_case("zxmainf_is_cut_off");
  EXPECT_EQ(result.exit_code, 4);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err, "errors errors");
}

TEST(zxmainf, a_program_runs_without_each_of_its_standard_streams) {
  for (unsigned missing = 1; missing < 8; ++missing) {
    SCOPED_TRACE(missing);
    kit::ProcessOptions options;
    options.missing = missing;
    options.input = "text";
    const auto result = kit::run_case("zxmainf_copies_input", {}, options);
    const bool has_input = (missing & kit::k_no_input) == 0;
    const std::string text = has_input ? "text" : "";
    EXPECT_EQ(result.exit_code, 3);
    EXPECT_EQ(result.out, (missing & kit::k_no_output) ? "" : text);
    EXPECT_EQ(result.err, (missing & kit::k_no_errors) ? "" : text);
  }
}

// ---- starting twice

ZX_CASE(zxmainf_starts_twice) {
  const char* arguments[] = {"tool.exe", "x"};
  program_version_text = "9";
  bail_wait_seconds = 0;
  init_zxlib_args(2, arguments);
  zxplat::set_last_error(0);
  init_zxlib_args(2, arguments);
  return 5;
}

TEST(zxmainf, a_second_start_is_fatal) {
  const auto result = kit::run_case("zxmainf_starts_twice");
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out,
            "\r\ntool.exe 9 Fatal Error init_zxlib called twice "
            "[0-0-0/0-0/0/init_zxlib c/]\r\n");
  EXPECT_EQ(result.err, "");
}

TEST(zxmainf, a_second_start_changes_nothing) {
  const std::string path(program_path.view());
  const std::int32_t count = g_args.length();
  const char* arguments[] = {"other", "a", "b", "c"};
  EXPECT_FAILURE(init_zxlib_args(4, arguments), "init_zxlib called twice",
                 "[0-0-0/E-0/E/init_zxlib c/]");
  kit::with_failures_dropped([&] { init_zxlib_args(4, arguments); });
  EXPECT_EQ(program_path.view(), path);
  EXPECT_EQ(g_args.length(), count);
}

// ---- ending

ZX_CASE(zxmainf_ends_with_result) {
  init_zxlib_args(argc, argv);
  oprint("not flushed");
  return std::atoi(argv[1]);
}

TEST(zxmainf, the_end_flushes_and_passes_the_result_on) {
  for (const int code : {0, 1, 7, 255}) {
    const auto result =
        kit::run_case("zxmainf_ends_with_result", {std::to_string(code)});
    EXPECT_EQ(result.exit_code, code);
    EXPECT_EQ(result.out, "not flushed");
  }
}

// Each switch of a descriptor, in order: "0b", "1t".
std::string switches;

void note_switches() {
  zxplat::files.set_mode = [](zxplat::Fd fd, zxplat::StreamMode mode) {
    switches += std::to_string(fd);
    switches += mode == zxplat::StreamMode::text ? "t " : "b ";
    return zxplat::system_files.set_mode(fd, mode);
  };
}

ZX_CASE(zxmainf_switches_modes) {
  note_switches();
  std::atexit([] { say(switches + "\n"); });  // behind the library's end
  init_zxlib_args(argc, argv);
  g_stdout.puts("binary\n");
  return 0;
}

TEST(zxmainf, the_streams_are_binary_until_the_end_and_then_text) {
  const auto result = kit::run_case("zxmainf_switches_modes");
  const std::string line_end = kit::on_windows() ? "\r\n" : "\n";
  EXPECT_EQ(result.out, "binary\n0b 1b 2b 0t 1t 2t " + line_end);
}

// Reads a byte ahead of the end and behind it.
ZX_CASE(zxmainf_leaves_nothing_in_buffers) {
  std::atexit([] {
    char room[8];
    const std::size_t count = zx_standard_stream(0).read(room, sizeof room);
    say(count == 0 ? "nothing left" : "left");
  });
  init_zxlib_args(argc, argv);
  const int byte = g_stdin.getc();
  g_stdout.putc(byte);
  zxBFile second;
  second.create("-");
  g_stdout.close();
  second.putc('2');
  second.handle = nullptr;  // nobody closes it
  return 0;
}

TEST(zxmainf, the_end_leaves_nothing_in_the_streams_buffers) {
  kit::ProcessOptions options;
  options.input = "abc";
  const auto result =
      kit::run_case("zxmainf_leaves_nothing_in_buffers", {}, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "a2nothing left");
}

// Tells what of the process-wide values is still there: "A" for g_args, "O"
// for g_opts, "P" for the program's values, "S" for the standard streams.
void say_what_is_there(std::string_view when) {
  std::string text(when);
  text += ':';
  if (g_args.length() > 0) text += 'A';
  if (g_opts.length() > 0) text += 'O';
  if (!program_path.is_empty() && !program_name.is_empty() &&
      !program_version.is_empty() && !current_dir.is_empty())
    text += 'P';
  else if (!program_path.is_empty() || !program_name.is_empty() ||
           !program_version.is_empty() || !current_dir.is_empty())
    text += '?';
  if (g_stdin.is_open() && g_stdout.is_open() && g_stderr.is_open())
    text += 'S';
  else if (g_stdin.is_open() || g_stdout.is_open() || g_stderr.is_open())
    text += '!';
  say(text + " ");
}

// The destructor of a static object runs behind all of it: its constructor
// ran ahead of main().
struct Last {
  ~Last() {
    if (kit::wanted_case() == "zxmainf_order_of_the_end")
      say_what_is_there("static");
  }
};
const Last last;

ZX_CASE(zxmainf_order_of_the_end) {
  std::atexit([] { say_what_is_there("first"); });
  init_zxlib_args(argc, argv);
  std::atexit([] { say_what_is_there("second"); });
  init_opts("-a");
  std::atexit([] { say_what_is_there("third"); });
  oprint("text ");
  return 0;
}

TEST(zxmainf, exit_handlers_run_backwards_with_the_librarys_own_among_them) {
  const auto result = kit::run_case("zxmainf_order_of_the_end", {"-a", "rest"});
  EXPECT_EQ(result.exit_code, 0);
  // The text waits in its buffer until the library's handler.
  EXPECT_EQ(result.out, "third:AOPS second:APS text first: static: ");
}

// ---- failing

// Fails with the error number 2 of the system.
void fail_with(const char* text) {
  zxplat::set_last_error(2);
  bail_code(1004, text);
}

ZX_CASE(zxmainf_fails_for_real) {
  init_zxlib_args(argc, argv);
  oprint("working on it");
  fail_with("a-long-name.csv");
  return 5;
}

// The one test that waits as a user has to.
TEST(zxmainf, a_failure_stands_on_the_screen_before_the_process_ends) {
  using Clock = std::chrono::steady_clock;
  const auto start = Clock::now();
  const auto result = kit::run_case("zxmainf_fails_for_real");
  const auto taken = Clock::now() - start;
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out,
            "working on it"
            "\r\n" +
                kit::self_path() + " " + std::string(program_version.view()) +
                " Fatal Error 1004: create: Can't open file "
                "'a-long-name.csv' for writing"
                "\r\n           [1004-1004-0/2-0/2/a-long-name./]"
                "\r\n");
  EXPECT_EQ(result.err, "");
  EXPECT_GE(taken, std::chrono::seconds(1));
  EXPECT_LT(taken, std::chrono::seconds(4));
}

ZX_CASE(zxmainf_fails_shortly) {
  const char* arguments[] = {"p"};
  bail_wait_seconds = 0;
  program_version_text = "v";
  init_zxlib_args(1, arguments);
  std::atexit([] { say("handler"); });
  fail_with("x");
  return 5;
}

TEST(zxmainf, a_failure_runs_the_exit_handlers) {
  const auto result = kit::run_case("zxmainf_fails_shortly");
  EXPECT_EQ(result.exit_code, 100);
  // Message and line have 67 bytes together, which is too much for one line.
  EXPECT_EQ(result.out,
            "\r\np v Fatal Error 1004: create: Can't open file 'x' for "
            "writing\r\n           [1004-1004-0/2-0/2/x/]\r\nhandler");
}

// A failure ahead of main(): nothing is known of the program yet.
struct FailsEarly {
  FailsEarly() {
    if (kit::wanted_case() != "zxmainf_fails_in_static_constructor") return;
    bail_wait_seconds = 0;
    zxplat::set_last_error(0);
    bailf("too early #", 1);
  }
};
const FailsEarly fails_early;

TEST(zxmainf, a_failure_in_a_static_constructor_shows_empty_names) {
  const auto result = kit::run_case("zxmainf_fails_in_static_constructor");
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out,
            "\r\n  Fatal Error too early 1 [0-0-0/0-0/0/too early 1/]\r\n");
  EXPECT_EQ(result.err, "");
}

void fail_in_handler() {
  bail_wait_seconds = 0;
  zxplat::set_last_error(0);
  bailf("late");
}

ZX_CASE(zxmainf_fails_in_early_handler) {
  std::atexit(fail_in_handler);  // it runs behind the library's
  init_zxlib_args(argc, argv);
  oprint("text");
  return 0;
}

TEST(zxmainf, a_failure_behind_the_librarys_end_shows_empty_names) {
  const auto result = kit::run_case("zxmainf_fails_in_early_handler");
  EXPECT_FALSE(result.timed_out);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out, "text\r\n  Fatal Error late [0-0-0/0-0/0/late/]\r\n");
}

ZX_CASE(zxmainf_fails_in_handler) {
  const char* arguments[] = {"p"};
  program_version_text = "v";
  init_zxlib_args(1, arguments);
  std::atexit(fail_in_handler);
  return 0;
}

TEST(zxmainf, a_failure_in_an_exit_handler_ends_the_process_all_the_same) {
  const auto result = kit::run_case("zxmainf_fails_in_handler");
  EXPECT_FALSE(result.timed_out);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out, "\r\np v Fatal Error late [0-0-0/0-0/0/late/]\r\n");
}

ZX_CASE(zxmainf_fails_twice) {
  const char* arguments[] = {"p"};
  bail_wait_seconds = 0;
  program_version_text = "v";
  init_zxlib_args(1, arguments);
  std::atexit(fail_in_handler);
  zxplat::set_last_error(0);
  bailf("first");
  return 5;
}

TEST(zxmainf, a_failure_in_the_end_of_a_failure_is_dropped) {
  const auto result = kit::run_case("zxmainf_fails_twice");
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out, "\r\np v Fatal Error first [0-0-0/0-0/0/first/]\r\n");
}

}  // namespace
