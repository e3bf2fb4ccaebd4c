// zxatsys_show.cpp - showing a failure: the box, the screen, the dump.
// Tests: tests/zxlib/zxatsys_test.cpp.
#include <cstring>

#include "zxatsys.h"
#include "zxatsys_impl.h"
#include "zxplat.h"

namespace {

// What the screen and the box show of a program's path, name, version and
// prefix at most, so that the message and the line always have their place.
constexpr std::size_t k_shown_path = 4096;
constexpr std::size_t k_shown_name = 256;
constexpr std::size_t k_shown_prefix = 1024;
// Beside them, the message and the words between.
constexpr std::size_t k_screen_room =
    k_shown_path + k_shown_name + k_bail_message_room + k_bail_line_room + 64;
constexpr std::size_t k_box_room = k_shown_prefix + k_bail_message_room + 64;
constexpr std::size_t k_caption_room = 2 * k_shown_name + 64;

// A message and a line that are together shorter than this share one line
// of the screen.
constexpr std::size_t k_one_line = 65;

// The word on the stack by which the dump knows its own frame.
constexpr std::uint32_t k_dump_check = 0x1234;

char bail_screen[k_screen_room];
char bail_box_text[k_box_room];
char bail_caption[k_caption_room];

void show_box(std::string_view message) {
  zxText text(bail_box_text);
  text.add(bail_prefix != nullptr ? bail_prefix : "", k_shown_prefix);
  text.add(" ");
  text.add(message);
  text.add("Program Terminated.\n");
  zxText caption(bail_caption);
  caption.add(bail_hooks.program_name(), k_shown_name);
  caption.add(" FATAL ERROR (");
  caption.add(bail_hooks.program_version(), k_shown_name);
  caption.add(")");
  zxplat::process.message_box(bail_box_text, bail_caption, zxplat::k_error_box);
}

// Turns the Hebrew letters of windows into those of the console.
void map_to_console(std::span<char> text) {
  constexpr unsigned char k_first = 224, k_last = 250, k_distance = 96;
  for (char& c : text) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte >= k_first && byte <= k_last)
      c = static_cast<char>(byte - k_distance);
  }
}

void print_screen(std::string_view message, std::string_view line) {
  const bool one_line = message.size() + line.size() < k_one_line;
  zxText out(bail_screen);
  out.add("\r\n");
  out.add(bail_hooks.program_path(), k_shown_path);
  out.add(" ");
  out.add(bail_hooks.program_version(), k_shown_name);
  out.add(" Fatal Error ");
  out.add(message);
  out.add(one_line ? " " : "\r\n           ");
  out.add(line);
  bail_hooks.print(out.view());
}

void dump(const zxText& message) {
  bail_hooks.dump(k_dump_check, message.c_str());
  zxplat::process.debug_break();
}

// Leaves the screen standing until the clock has moved on.
void wait_for_reader() {
  constexpr std::uint32_t k_step = 10;
  const std::int64_t start = zxplat::process.clock();
  while (zxplat::process.clock() - start < bail_wait_seconds)
    zxplat::process.sleep(k_step);
}

}  // namespace

constinit const char* bail_prefix = "";
constinit std::int64_t bail_wait_seconds = 2;

void bail_print_directly(std::string_view text) {
  zxplat::set_binary(zxplat::k_stdout_fd);  // start-up may not have come yet
  zxplat::write_all(zxplat::k_stdout_fd, text);
}

void show_failure(zxText& message, const char* line) {
  if ((traits & k_trait_console) == 0) {
    message.add("\n");
    message.add(line);
    message.add("\n");
    show_box(message.view());
    map_to_console(message.span());
    dump(message);
  }
  print_screen(message.view(), line);
  message.add(" ");
  message.add(line);
  dump(message);
  wait_for_reader();
  bail_hooks.print("\r\n");
}
