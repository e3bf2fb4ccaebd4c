// zxplat_win32.cpp - errors, names, the process and its clocks, folders,
// for Windows.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "zxplat_impl.h"
#include "zxplat_win32_impl.h"

namespace zxplat {
namespace win32 {
namespace {

struct ErrorRow {
  int from;
  int number;
};

// Where the runtime failed of itself, the system has no number.
constexpr ErrorRow k_runtime_rows[] = {
    {EMFILE, k_err_too_many_open}, {ENFILE, k_err_too_many_open},
    {EACCES, k_err_denied},        {EEXIST, k_err_exists_on_create},
    {ENOENT, k_err_not_found},     {EINVAL, k_err_bad_parameter},
    {ENOMEM, k_err_no_memory},     {ENOSPC, k_err_disk_full},
    {EPIPE, k_err_broken_pipe},
};

// Numbers that say the same thing as one that the library knows.
constexpr ErrorRow k_system_rows[] = {
    {ERROR_INVALID_DRIVE, k_err_path_not_found},
    {ERROR_BAD_PATHNAME, k_err_path_not_found},
    {ERROR_DIRECTORY, k_err_path_not_found},
    {ERROR_FILENAME_EXCED_RANGE, k_err_bad_name},
    {ERROR_HANDLE_DISK_FULL, k_err_disk_full},
    {ERROR_NEGATIVE_SEEK, k_err_bad_parameter},
    {ERROR_NO_DATA, k_err_broken_pipe},
};

template <std::size_t count>
int look_up(const ErrorRow (&rows)[count], int from, int otherwise) {
  for (const ErrorRow& row : rows) {
    if (row.from == from) return row.number;
  }
  return otherwise;
}

// The runtime alone knows whether a descriptor is open, and that a stream
// was not opened for this direction is the same failure.
int number_of_failure() {
  const int system = last_error();
  if (errno == EBADF) return k_err_bad_handle;
  if (system != k_err_none) return look_up(k_system_rows, system, system);
  return look_up(k_runtime_rows, errno, k_err_io);
}

}  // namespace

Attempt::Attempt() : before(last_error()) {
  set_last_error(k_err_none);
  errno = 0;
}

void Attempt::restore() const { set_last_error(before); }

void Attempt::settle_failure() { set_last_error(number_of_failure()); }

std::int64_t seconds_since_1970(std::uint32_t high, std::uint32_t low) {
  constexpr std::int64_t k_per_second = 10'000'000;
  constexpr std::int64_t k_1970 = 11'644'473'600;  // in seconds
  return (std::int64_t{high} << 32 | low) / k_per_second - k_1970;
}

bool to_name(std::string_view name, Name& out) {
  if (name.empty()) return fail_with(k_err_path_not_found);
  if (name.find('\0') != name.npos) return fail_with(k_err_bad_name);
  if (name.size() > k_max_name) return fail_with(k_err_bad_name);
  if (is_null_device(name)) return fail_with(k_err_not_found);
  std::memcpy(out.text, name.data(), name.size());
  out.text[name.size()] = '\0';
  return true;
}

bool fail_with(int number) {
  set_last_error(number);
  return false;
}

}  // namespace win32

namespace {

using win32::Attempt;

// -- process and clocks --

void end_process(int code) { std::exit(code); }

void end_process_at_once(int code) { std::_Exit(code); }

std::int64_t wall_clock() {
  FILETIME time;
  ::GetSystemTimeAsFileTime(&time);
  return win32::seconds_since_1970(time.dwHighDateTime, time.dwLowDateTime);
}

std::uint32_t uptime() { return ::GetTickCount(); }

void pause_for(std::uint32_t milliseconds) { ::Sleep(milliseconds); }

void show_box(const char* text, const char* caption, std::uint32_t style) {
  const common::BoxText words(text, caption, style);
  if (!common::divert_box(words.view()))
    ::MessageBoxA(nullptr, text, caption, style);
}

void say_last_words(const char* text) {
  if (!common::divert_box(text)) ::FatalAppExitA(0, text);
}

void show_in_debugger(const char* text) {
  common::divert_debug_output(text);
  ::OutputDebugStringA(text);
}

// The low word of the version is the major number and, above it, the minor
// one; the highest bit tells the platform, 1 or 2.
bool is_windows_95() {
  const DWORD version = ::GetVersion();
  return (version & 0x8000FFFF) == 0x80000004;
}

constexpr ProcessCalls k_calls = {end_process,      end_process_at_once,
                                  wall_clock,       uptime,
                                  pause_for,        show_box,
                                  say_last_words,   win32::break_into_debugger,
                                  show_in_debugger, is_windows_95};

// The runtime's answer for a standard stream without anything behind it is
// either of two negative numbers.
bool is_bound(Fd fd) { return ::_get_osfhandle(fd) >= 0; }

void bind_to_null_device(Fd fd) {
  const int null = ::_open("NUL", _O_RDWR | _O_BINARY);
  if (null == k_no_fd || null == fd) return;
  ::_dup2(null, fd);
  ::_close(null);
}

void ignore_parameter(const wchar_t*, const wchar_t*, const wchar_t*, unsigned,
                      std::uintptr_t) {}

// The system's two calls for folders give the length without the NUL if the
// text fits, else the size that is needed, NUL included.
std::size_t text_length(const Attempt& attempt, DWORD result,
                        std::size_t size) {
  const std::size_t length =
      result >= size && result != 0 ? result - 1 : result;
  return attempt.settle(length, length != 0);
}

DWORD room(std::span<char> out) { return static_cast<DWORD>(out.size()); }

}  // namespace

int last_error() { return static_cast<int>(::GetLastError()); }

void set_last_error(int number) { ::SetLastError(static_cast<DWORD>(number)); }

const ProcessCalls system_process = k_calls;
constinit ProcessCalls process = k_calls;

// There is no signal to guard against here, but some runtimes end the
// process over a bad descriptor unless told that we look at results.
void prepare_process() {
  const Attempt attempt;
  ::_set_invalid_parameter_handler(ignore_parameter);
  for (const Fd fd : {k_stdin_fd, k_stdout_fd, k_stderr_fd}) {
    if (!is_bound(fd)) bind_to_null_device(fd);
  }
  attempt.restore();
}

bool set_binary(Fd fd) {
  const Attempt attempt;
  return attempt.settle(is_bound(fd) && ::_setmode(fd, _O_BINARY) != -1);
}

// The runtime counts the null device as a terminal; only a console has a
// mode.
bool is_terminal(Fd fd) {
  const Attempt attempt;
  DWORD mode;
  const bool is_console =
      ::_isatty(fd) != 0 &&
      ::GetConsoleMode(reinterpret_cast<HANDLE>(::_get_osfhandle(fd)), &mode);
  attempt.restore();
  return is_console;
}

std::size_t current_directory(std::span<char> out) {
  const Attempt attempt;
  const DWORD result = ::GetCurrentDirectoryA(room(out), out.data());
  return text_length(attempt, result, out.size());
}

std::size_t temp_directory(std::span<char> out) {
  const Attempt attempt;
  const DWORD result = ::GetTempPathA(room(out), out.data());
  return text_length(attempt, result, out.size());
}

}  // namespace zxplat
