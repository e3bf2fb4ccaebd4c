// zxtext.h - zxText, which composes text in a buffer of fixed size.
//
// It is for places that must work when the heap does not: the failure core,
// the stack dump.  It allocates nothing and has no failure of its own; what
// does not fit is cut off.
#ifndef ZXTEXT_H
#define ZXTEXT_H

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

class zxText {
 public:
  // Starts behind the first `length` bytes of `buffer`, which stay.  The
  // buffer has room for one byte at least; the text in it always ends in a
  // NUL, which length() does not count.
  explicit zxText(std::span<char> buffer, std::size_t length = 0);

  void add(std::string_view text);
  // The first `at_most` bytes of it.
  void add(std::string_view text, std::size_t at_most);
  // In decimal, with blanks in front up to `width` characters.
  void add_int(std::int32_t number, std::size_t width = 0);
  // In hexadecimal, exactly `digits` of them (at most 16), the lowest ones.
  void add_hex(std::uint64_t number, std::size_t digits, bool upper = true);
  // An address in the form of "%p": upper case, all its digits.
  void add_address(std::uintptr_t address) {
    add_hex(address, 2 * sizeof address);
  }

  std::size_t length() const { return used; }
  std::string_view view() const { return {room.data(), used}; }
  const char* c_str() const { return room.data(); }
  // The text for changes in place.
  std::span<char> span() const { return room.first(used); }

 private:
  std::span<char> room;
  std::size_t used;
};

#endif  // ZXTEXT_H
