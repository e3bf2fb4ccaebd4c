// zxtext.cpp - text in a buffer of fixed size.
// Tests: tests/zxlib/zxtext_test.cpp.
#include "zxtext.h"

#include <charconv>
#include <cstring>

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

void zxText::add_int(std::int32_t number, std::size_t width) {
  char digits[12];
  const auto end = std::to_chars(digits, digits + sizeof digits, number).ptr;
  const auto size = static_cast<std::size_t>(end - digits);
  for (std::size_t i = size; i < width; ++i) add(" ");
  add({digits, size});
}

void zxText::add_hex(std::uint64_t number, std::size_t digits, bool upper) {
  const char* const signs = upper ? "0123456789ABCDEF" : "0123456789abcdef";
  char text[16];
  if (digits > sizeof text) digits = sizeof text;
  for (std::size_t i = digits; i > 0; --i, number >>= 4)
    text[i - 1] = signs[number & 0xF];
  add({text, digits});
}
