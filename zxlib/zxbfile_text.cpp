// zxbfile_text.cpp - lines of text in the file class.
// Tests: tests/zxlib/zxbfile_test.cpp.
#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "zxbfile.h"

namespace {

// The steps in which the room of a line is counted, and the largest count.
constexpr std::int32_t k_step = 100;
static_assert(zxBFile::k_max_line == INT32_MAX / k_step * k_step);

bool is_shared(const zxStr& text) { return text.representation()->refs >= 2; }

// The room for a line of `length` bytes where `present` is too little.  It
// grows by half at least, so that a long line is copied a few times only, and
// is more than `length`, so that the string adds no margin of its own.
std::int32_t room_for(std::int32_t length, std::int32_t present) {
  const std::int64_t wanted =
      std::max<std::int64_t>(length, std::int64_t{present} + present / 2);
  const std::int64_t rounded = (wanted / k_step + 1) * k_step;
  return static_cast<std::int32_t>(std::min<std::int64_t>(rounded, INT32_MAX));
}

// The part of the bytes up to a line feed and with it; all without one.
std::string_view first_line(std::string_view bytes) {
  if (bytes.empty()) return bytes;
  const void* const feed = std::memchr(bytes.data(), '\n', bytes.size());
  if (feed == nullptr) return bytes;
  const auto length = static_cast<const char*>(feed) - bytes.data() + 1;
  return bytes.substr(0, static_cast<std::size_t>(length));
}

// Adds to a text that no other shares; false if the line is too long.
bool add_piece(zxStr& text, std::string_view piece) {
  const std::int64_t length =
      std::int64_t{text.length()} + static_cast<std::int64_t>(piece.size());
  if (length > zxBFile::k_max_line) return false;
  const auto sum = static_cast<std::int32_t>(length);
  if (sum >= text.capacity()) text.reserve(room_for(sum, text.capacity()));
  text.append(piece.data(), zx_count(piece.size()));
  return true;
}

// Empties the text, but keeps a block that is its own.
void start_line(zxStr& text) {
  if (is_shared(text))
    text.clear();
  else
    text.set_length(0);
}

// Makes the piece the whole text; false if it is too long.  Most lines are
// one piece, for which there is room already.
bool start_with(zxStr& text, std::string_view piece) {
  const bool is_own = text.representation()->refs == 1;
  if (is_own && piece.size() < zx_size(text.capacity())) {
    text.build(piece.data(), zx_count(piece.size()));
    return true;
  }
  start_line(text);
  return add_piece(text, piece);
}

}  // namespace

void zxBFile::count_lines(std::int32_t more) {
  lines = static_cast<std::int32_t>(static_cast<std::uint32_t>(lines) +
                                    static_cast<std::uint32_t>(more));
}

bool zxBFile::gets(zxStr& text) {
  if (handle == nullptr) {
    bail_code(1025);
    return false;
  }
  count_lines(1);
  if (read_line(text)) return true;
  count_lines(-1);
  if (handle->error()) bail_code(1029, name);
  return false;
}

// False if no byte came.
bool zxBFile::read_line(zxStr& text) {
  std::string_view piece = first_line(handle->unread());
  if (piece.empty()) {
    start_line(text);
    return false;
  }
  bool fits = start_with(text, piece);
  while (fits) {
    handle->skip(piece.size());
    if (piece.back() == '\n') return true;
    piece = first_line(handle->unread());
    if (piece.empty()) return true;
    fits = add_piece(text, piece);
  }
  text.clear();
  bail_code(2005, name);
  return false;
}

void zxBFile::puts(const zxStr& text) {
  if (handle == nullptr) return bail_code(1024);
  write(text.c_str(), text.length());
  count_lines(1);
}

bool zxBFile::newline() {
  return handle != nullptr && handle->write("\r\n", 2);
}
