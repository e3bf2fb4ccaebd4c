// zxplat_posix.cpp - errors, the process and its clocks, folders,
// for POSIX systems.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <fcntl.h>
#include <signal.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "zxplat_impl.h"
#include "zxplat_posix_impl.h"

namespace zxplat {
namespace {

using posix::fail;
using posix::retry;

constinit int g_last_error = k_err_none;

constexpr std::int64_t k_milliseconds = 1000;
constexpr std::int64_t k_nanoseconds_each = 1'000'000;  // in a millisecond

// -- process and clocks --

void end_process(int code) { std::exit(code); }

void end_process_at_once(int code) { std::_Exit(code); }

timespec now(clockid_t clock) {
  timespec time = {};
  ::clock_gettime(clock, &time);  // cannot fail for the clocks used here
  return time;
}

std::int64_t wall_clock() { return now(CLOCK_REALTIME).tv_sec; }

std::uint32_t uptime() {
  const timespec time = now(CLOCK_BOOTTIME);
  return static_cast<std::uint32_t>(time.tv_sec * k_milliseconds +
                                    time.tv_nsec / k_nanoseconds_each);
}

void pause_for(std::uint32_t milliseconds) {
  timespec left = {
      static_cast<time_t>(milliseconds / k_milliseconds),
      static_cast<long>(milliseconds % k_milliseconds * k_nanoseconds_each)};
  while (::clock_nanosleep(CLOCK_MONOTONIC, 0, &left, &left) == EINTR) {
  }
}

// There are no boxes here.
void write_box(const char* text, const char* caption, std::uint32_t style) {
  const common::BoxText words(text, caption, style);
  if (!common::divert_box(words.view()))
    common::write_to_standard_error(words.view());
}

void write_last_words(const char* text) {
  if (!common::divert_box(text)) common::write_to_standard_error(text);
}

// Debuggers have no ear for texts here.
void write_debug_output(const char* text) { common::divert_debug_output(text); }

bool is_windows_95() { return false; }

constexpr ProcessCalls k_calls = {
    end_process,        end_process_at_once,
    wall_clock,         uptime,
    pause_for,          write_box,
    write_last_words,   posix::break_into_debugger,
    write_debug_output, is_windows_95};

bool is_open(Fd fd) { return ::fcntl(fd, F_GETFD) != -1; }

// Child processes are to have the descriptor as well, as they would have
// had the stream that is missing.
void bind_to_null_device(Fd fd) {
  const int null = retry([] { return ::open("/dev/null", O_RDWR); });
  if (null == k_no_fd || null == fd) return;
  ::dup2(null, fd);
  ::close(null);
}

// -- folders --

// The variable that names the temporary folder; null if none does.
const char* temp_variable() {
  for (const char* name : {"TMPDIR", "TMP", "TEMP"}) {
    const char* value = std::getenv(name);
    if (value != nullptr && *value != '\0') return value;
  }
  return nullptr;
}

void copy_as_name(std::string_view path, char* out) {
  std::replace_copy(path.begin(), path.end(), out, '/', '\\');
  out[path.size()] = '\0';
}

}  // namespace

int last_error() { return g_last_error; }

void set_last_error(int number) { g_last_error = number; }

const ProcessCalls system_process = k_calls;
constinit ProcessCalls process = k_calls;

void prepare_process() {
  ::signal(SIGPIPE, SIG_IGN);
  for (const Fd fd : {k_stdin_fd, k_stdout_fd, k_stderr_fd}) {
    if (!is_open(fd)) bind_to_null_device(fd);
  }
}

// There is no other kind of stream here.
bool set_binary(Fd fd) { return is_open(fd) || fail(); }

bool is_terminal(Fd fd) { return ::isatty(fd) == 1; }

std::size_t current_directory(std::span<char> out) {
  char text[k_max_name + 1];
  if (::getcwd(text, sizeof text) == nullptr) {
    fail();
    return 0;
  }
  const std::string_view path(text);
  if (path.size() < out.size()) copy_as_name(path, out.data());
  return path.size();
}

bool set_current_directory(std::string_view name) {
  posix::Path path;
  if (!posix::to_path(name, path)) return false;
  return posix::on_existing(path, ::chdir) == 0 || posix::fail_on(path);
}

std::size_t temp_directory(std::span<char> out) {
  const char* value = temp_variable();
  const std::string_view path = value != nullptr ? value : "/tmp/";
  const bool is_closed = path.back() == '/' || path.back() == '\\';
  const std::size_t length = path.size() + (is_closed ? 0 : 1);
  if (length >= out.size()) return length;
  copy_as_name(path, out.data());
  if (!is_closed) std::memcpy(out.data() + path.size(), "\\", 2);
  return length;
}

}  // namespace zxplat
