// zxatsys.cpp - the failure core.
// Tests: tests/zxlib/zxatsys_test.cpp.
#include "zxatsys.h"

#include <charconv>
#include <cstring>

#include "zxatsys_impl.h"
#include "zxplat.h"

namespace {

// Long enough that no file name or text of common size is cut where the
// message shows it whole; the screen adds the line behind it.
constexpr std::size_t k_message_room = 16384;
// Eight numbers or cut texts, brackets and separators.
constexpr std::size_t k_line_room = 192;
// What the screen shows of a program path and a version at most, so that the
// message and the line always have their place.
constexpr std::size_t k_shown_path = 4096;
constexpr std::size_t k_shown_version = 256;
// All of these and the words between.
constexpr std::size_t k_screen_room =
    k_shown_path + k_shown_version + k_message_room + k_line_room + 64;

// A message and a line that are together shorter than this share one line
// of the screen.
constexpr std::size_t k_one_line = 65;
// Free texts are cut to this in the message.
constexpr std::size_t k_free_text = 140;
// The cuts of the two texts in the diagnostic line.
constexpr std::size_t k_line_text = 12;
constexpr std::size_t k_line_detail = 18;

char bail_message[k_message_room];
char bail_line[k_line_room];
char bail_screen[k_screen_room];

const char* no_text() { return ""; }

struct Failure {
  std::int32_t number;
  const char* text;  // may be null
  const BailDetail& detail;
  int first_error;
  int second_error;
};

bool is_set(const char* text) { return text != nullptr && *text != '\0'; }

const char* or_empty(const char* text) { return text ? text : ""; }

// Adds a row of the message table with its place for the argument filled.
// The row is never handed to a formatter: an argument is text, whatever it
// holds.
void add_row(zxText& out, std::string_view row, const char* text) {
  const std::size_t place = row.find('%');
  out.add(row.substr(0, place));
  if (place == std::string_view::npos) return;
  row.remove_prefix(place);
  constexpr std::string_view k_cut_place = "%.140s";
  if (row.starts_with(k_cut_place)) {
    out.add(or_empty(text), k_free_text);
    out.add(row.substr(k_cut_place.size()));
  } else {
    out.add(or_empty(text));
    out.add(row.substr(2));
  }
}

void add_words(zxText& out, const Failure& failure) {
  if (const char* row = find_bail_message(failure.number))
    add_row(out, row, failure.text);
  else if (failure.text != nullptr)
    out.add(failure.text, k_free_text);
  else if (failure.number == 0)
    out.add("0:!");
}

void add_detail(zxText& out, const BailDetail& detail) {
  const bool with_text = is_set(detail.text);
  if (detail.number == 0 && !with_text) return;
  out.add(" (");
  if (detail.number != 0) out.add_int(detail.number);
  if (detail.number != 0 && with_text) out.add(": ");
  if (with_text) out.add(detail.text);
  out.add(")");
}

std::string_view compose_message(const Failure& failure) {
  zxText out(bail_message);
  if (failure.number != 0) {
    out.add_int(failure.number);
    out.add(": ");
  }
  add_words(out, failure);
  add_detail(out, failure.detail);
  return out.view();
}

std::string_view compose_line(const Failure& failure) {
  zxText out(bail_line);
  out.add("[");
  out.add_int(failure.number);
  out.add("-");
  out.add_int(failure.number);
  out.add("-");
  out.add_int(failure.detail.number);
  out.add("/");
  out.add_int(failure.first_error);
  out.add("-0/");
  out.add_int(failure.second_error);
  out.add("/");
  out.add(or_empty(failure.text), k_line_text);
  out.add("/");
  out.add(or_empty(failure.detail.text), k_line_detail);
  out.add("]");
  return out.view();
}

void print_screen(std::string_view message, std::string_view line) {
  const bool one_line = message.size() + line.size() < k_one_line;
  zxText out(bail_screen);
  out.add("\r\n");
  out.add(bail_hooks.program_path(), k_shown_path);
  out.add(" ");
  out.add(bail_hooks.program_version(), k_shown_version);
  out.add(" Fatal Error ");
  out.add(message);
  out.add(one_line ? " " : "\r\n           ");
  out.add(line);
  bail_hooks.print(out.view());
}

// Leaves the screen standing until the clock has moved on.
void wait_for_reader() {
  constexpr std::uint32_t k_step = 10;
  const std::int64_t start = zxplat::process.clock();
  while (zxplat::process.clock() - start < bail_wait_seconds)
    zxplat::process.sleep(k_step);
}

void bail_core(std::int32_t number, const char* text,
               const BailDetail& detail) {
  const int first_error = zxplat::last_error();
  const int second_error = zxplat::last_error();
  if (bail_guard) return;
  bail_guard = true;
  const Failure failure{number, text, detail, first_error, second_error};
  const std::string_view message = compose_message(failure);
  const std::string_view line = compose_line(failure);
  print_screen(message, line);
  wait_for_reader();
  bail_hooks.print("\r\n");
  zxplat::process.exit(k_exit_failure);
}

}  // namespace

constinit bool bail_guard = false;
constinit std::int64_t bail_wait_seconds = 2;
constinit BailHooks bail_hooks = {no_text, no_text, bail_print_directly};

void bail_print_directly(std::string_view text) {
  zxplat::set_binary(zxplat::k_stdout_fd);  // start-up may not have come yet
  while (!text.empty()) {
    const std::int64_t done =
        zxplat::files.write(zxplat::k_stdout_fd, text.data(), text.size());
    if (done <= 0) return;
    text.remove_prefix(static_cast<std::size_t>(done));
  }
}

void bail_code(std::int32_t number) { bail_core(number, nullptr, no_detail); }

void bail_code(std::int32_t number, const char* text,
               const BailDetail& detail) {
  bail_core(number, text, detail);
}

void bail_detail(std::int32_t number, const BailDetail& detail) {
  bail_core(number, nullptr, detail);
}

void bail_detail(std::int32_t number, const char* text,
                 const BailDetail& detail) {
  bail_core(number, text, detail);
}

void assert_fail(std::int32_t line, const char* file) {
  // The position text of the failure that is being reported must stand.
  if (bail_guard) return;
  zx_pos = zxPos{file, line};
  bail_core(1000, pos_string(zx_pos), no_detail);
}

zxText::zxText(std::span<char> buffer, std::size_t length)
    : room(buffer), used(length < buffer.size() ? length : buffer.size() - 1) {
  room[used] = '\0';
}

void zxText::add(std::string_view text) {
  const std::size_t left = room.size() - 1 - used;
  const std::size_t size = text.size() < left ? text.size() : left;
  if (size > 0) std::memcpy(room.data() + used, text.data(), size);
  used += size;
  room[used] = '\0';
}

void zxText::add(std::string_view text, std::size_t at_most) {
  add(text.substr(0, at_most));
}

void zxText::add_int(std::int32_t number) {
  char digits[12];
  const auto end = std::to_chars(digits, digits + sizeof digits, number).ptr;
  add({digits, static_cast<std::size_t>(end - digits)});
}
