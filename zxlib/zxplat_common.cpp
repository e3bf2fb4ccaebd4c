// zxplat_common.cpp - what both targets have in common: writing all of a
// text, the name of the null device, message boxes that are written instead
// of shown.
// Tested by tests/zxlib/zxplat_test.cpp.

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "zxplat.h"
#include "zxplat_impl.h"

namespace zxplat {

bool write_all(Fd fd, std::string_view text) {
  while (!text.empty()) {
    const std::int64_t done = files.write(fd, text.data(), text.size());
    if (done <= 0) return false;
    text.remove_prefix(static_cast<std::size_t>(done));
  }
  return true;
}

bool is_null_device(std::string_view name) {
  return name.size() == 3 && (name[0] | 0x20) == 'n' &&
         (name[1] | 0x20) == 'u' && (name[2] | 0x20) == 'l';
}

const char* environment_variable(const char* name) { return std::getenv(name); }

}  // namespace zxplat

namespace zxplat::common {
namespace {

// Adds a text to the file that an environment variable names; "-" is
// standard error.  False if it names no place that can be written to.
bool divert_by(const char* variable, std::string_view text) {
  const char* place = std::getenv(variable);
  if (place == nullptr || *place == '\0') return false;
  if (std::string_view(place) == "-") {
    write_to_standard_error(text);
    return true;
  }
  const Fd fd = files.open(place, OpenMode::append);
  if (fd == k_no_fd) return false;
  write_all(fd, text);
  files.close(fd);
  return true;
}

// "0x" and at least four digits, as styles are usually written.
std::string_view in_hexadecimal(std::uint32_t number, char (&room)[10]) {
  char* at = std::end(room);
  for (int digits = 0; digits < 4 || number != 0; ++digits, number >>= 4)
    *--at = "0123456789abcdef"[number & 0xF];
  *--at = 'x';
  *--at = '0';
  return {at, static_cast<std::size_t>(std::end(room) - at)};
}

}  // namespace

BoxText::BoxText(const char* text, const char* caption, std::uint32_t style) {
  char style_room[10];
  for (const std::string_view piece :
       {std::string_view(caption), in_hexadecimal(style, style_room),
        std::string_view(text)}) {
    add(piece);
    add("\n");
  }
}

void BoxText::add(std::string_view piece) {
  const std::size_t size = std::min(piece.size(), sizeof room - used);
  std::memcpy(room + used, piece.data(), size);
  used += size;
}

void write_to_standard_error(std::string_view text) {
  set_binary(k_stderr_fd);  // start-up may not have come yet
  write_all(k_stderr_fd, text);
}

bool divert_box(std::string_view text) { return divert_by("ZX_BOX_OUT", text); }

bool divert_debug_output(std::string_view text) {
  return divert_by("ZX_DEBUG_OUT", text);
}

}  // namespace zxplat::common
