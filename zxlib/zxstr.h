// zxstr.h - zxStr, the library's string: a byte text with shared
// representation and copy on write.
//
// Differences from std::string:
//   - copying and passing by value costs a count, not a copy; the characters
//     are shared until one of the holders writes;
//   - an empty string costs no allocation: all share one representation;
//   - growth is by a fixed margin, not by doubling: append adds room for 64
//     characters, builders (construction, concatenation, assignment from
//     text) take exactly what they need.  Call reserve() ahead of long
//     building;
//   - the checks are part of every build: a broken precondition ends the
//     process (message 1000), and each operation first checks the
//     representation's invariant;
//   - lengths and capacities are signed 32-bit numbers; there is no other
//     limit, and NUL is a character like any other.
//
// A string is used by one thread at a time, and strings that share a
// representation count as one string for that rule.
//
// After a failure that was dropped (see zxatsys.h) an operation leaves the
// string unchanged and returns a neutral value.
#ifndef ZXSTR_H
#define ZXSTR_H

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "zxatsys.h"
#include "zxmisc.h"

// What a zxStr points at: three counts and the characters, in one block of
// capacity + 16 bytes.
//
//     0           4       8         12
//   +-----------+-------+---------+---------------------+-----+
//   | capacity  | refs  | length  | length characters   | NUL | ...
//   +-----------+-------+---------+---------------------+-----+
//
// refs is the number of strings that share the block; 0 marks a block that
// is not counted and that nobody frees: the shared empty one.
// Invariant: 0 <= length <= capacity, refs >= 0, a NUL at data[length].
struct zxStrRep {
  std::int32_t capacity;
  std::int32_t refs;
  std::int32_t length;
  char data[1];
};
static_assert(offsetof(zxStrRep, refs) == 4);
static_assert(offsetof(zxStrRep, length) == 8);
static_assert(offsetof(zxStrRep, data) == 12);

// The representation of every default-constructed string.
extern zxStrRep zx_empty_rep;

class zxStr {
 public:
  // ---- making: a null pointer or a negative length fails an assertion and
  // leaves the string empty.
  constexpr zxStr() : rep(&zx_empty_rep) {}
  zxStr(const char* text);
  zxStr(const char* characters, std::int32_t length);
  explicit zxStr(char byte);
  explicit zxStr(std::string_view text);
  zxStr(const zxStr& other);
  zxStr(zxStr&& other) noexcept : zxStr() {
    *this = static_cast<zxStr&&>(other);
  }
  ~zxStr() { release(); }

  // ---- assigning: from a string shares, from text and bytes rebuilds.
  zxStr& operator=(const zxStr& other);
  zxStr& operator=(zxStr&& other) noexcept;
  zxStr& operator=(const char* text);
  zxStr& operator=(char byte);

  // Makes the string hold `a` followed by `b`, which may be absent (null and
  // 0).  The representation takes exactly the sum unless it is unshared and
  // large enough already.  The characters may be those of this string.
  void build(const char* a, std::int32_t a_length, const char* b = nullptr,
             std::int32_t b_length = 0);

  // ---- reading
  std::int32_t length() const { return rep->length; }
  bool is_empty() const { return check() && rep->length == 0; }
  std::int32_t capacity() const { return rep->capacity; }

  // The characters with a NUL behind them; valid until the string changes or
  // dies.
  const char* c_str() const { return rep->data; }
  std::string_view view() const& { return {rep->data, zx_size(rep->length)}; }
  std::string_view view() const&& = delete;

  // Character i; an index outside 0 to length - 1 fails an assertion.
  char operator[](std::int32_t i) const;

  // The place of character i for writing, unshared first, so that reading
  // through it costs the sharing too.  The same bounds.
  char& at(std::int32_t i);

  // Checks the representation's invariant, as nearly every operation does
  // first; a broken one fails an assertion.
  bool check() const {
    return ZX_ASSERT(rep->length >= 0 && rep->length <= rep->capacity &&
                     rep->refs >= 0 && rep->data[rep->length] == '\0');
  }

  // ---- comparing, by length and bytes
  friend bool operator==(const zxStr& a, const zxStr& b) {
    return b.check() && a.equals(b.c_str(), b.length());
  }
  bool operator==(const char* text) const;
  bool operator==(char byte) const;

  // ---- sizing
  // Makes room for n characters; never gives room back.  Negative n fails an
  // assertion.  A shared string becomes unshared if it has to grow; n of 0 on
  // an empty one of its own gives its block back.
  void reserve(std::int32_t n);

  // Cuts or widens to n characters; new ones are NUL.  Widening beyond the
  // capacity takes n + 64.  Does nothing at all if n is the present length.
  void set_length(std::int32_t n);

  // set_length(n), unshared: the place for up to n characters and a NUL.  The
  // caller fills it and calls sync_length().
  char* buffer(std::int32_t n);

  // Sets the length by the first NUL within the capacity, which a caller of
  // buffer() left.
  void sync_length();

  // ---- appending: in place with room for 64 more when the room is used up;
  // a shared string gets a representation of exactly the new length.  The
  // appended text may be a part of this string.
  zxStr& append(char byte);
  zxStr& append(const char* text);
  zxStr& append(const char* characters, std::int32_t length);
  zxStr& append(const zxStr& other);
  zxStr& operator+=(char byte) { return append(byte); }
  zxStr& operator+=(const char* text) { return append(text); }
  zxStr& operator+=(const zxStr& other) { return append(other); }

  // ---- the rest
  // Copies the characters and a NUL out; a null buffer, or a size that is not
  // above the length, fails an assertion.
  void copy_to(char* out, std::int32_t size) const;

  // Empties the string: the only holder gives the block back.
  void clear();

  // Gives the string a representation of its own if others share it.
  void unshare();

  // ASCII letters in place; no other byte changes, and a string without a
  // letter to change stays shared.
  void to_upper();
  void to_lower();

  // The decimal integer that the text spells, white space at both ends
  // ignored: a sign, digits with commas between them, and as the last
  // character k or K for thousands, m or M for millions.  Anything else, and
  // a value beyond 32 bits, gives 0.
  std::int32_t to_int() const;

  // The address that tells which strings share.
  const zxStrRep* representation() const { return rep; }

 private:
  bool equals(const char* text, std::int32_t size) const;
  void release();
  bool is_within(const char* place) const;
  void take_exactly(std::int32_t n);
  void resize_block(std::int32_t n);
  void make_room(std::int32_t n);
  template <class Fold>
  void fold_case(Fold fold);

  zxStrRep* rep;
};
static_assert(sizeof(zxStr) == sizeof(void*));

// The block is found through the one pointer, wherever that lies.
template <>
inline constexpr bool zx_relocatable<zxStr> = true;

// Concatenation: a new string of exactly the two lengths.  If one side is
// empty the result shares the other where that is a string; the byte forms
// never share.
zxStr operator+(const zxStr& a, const zxStr& b);
zxStr operator+(const zxStr& a, const char* b);
zxStr operator+(const char* a, const zxStr& b);
zxStr operator+(const zxStr& a, char b);
zxStr operator+(char a, const zxStr& b);

// The failure entry for texts held in a string.
void bail_code(std::int32_t number, const zxStr& text,
               const BailDetail& detail = no_detail);

// The library's checksum of 16 bits: polynomial 0x1021, the highest bit
// first, from 0xFFFF on, no final inversion.  It is the hash of string keys
// and reaches disk: it never changes.
std::uint16_t crc16(const void* bytes, std::size_t size);
std::uint16_t crc16_add(std::uint16_t crc, const void* bytes, std::size_t size);

#endif  // ZXSTR_H
