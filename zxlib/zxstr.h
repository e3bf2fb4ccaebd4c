// zxstr.h - zxStr, the library's string: a byte text with shared
// representation and copy on write; zxIStr, its form with room inside the
// object; the checksums of 16 and of 32 bits.
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

#include <compare>
#include <cstddef>
#include <cstdint>
#include <new>
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
// refs is the number of strings that share the block.  One holder writes to
// it in place, several unshare first.  0 marks a block that is not counted
// and that nobody frees: the shared empty one, and the room inside a zxIStr.
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
  zxStr(const zxStr& other) : rep(&zx_empty_rep) {
    if (other.check() && other.rep->refs > 0 && other.rep->length > 0)
      share(other);
    else
      *this = other;  // empty, or not to be shared
  }
  zxStr(zxStr&& other) noexcept : rep(&zx_empty_rep) {
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
  operator std::string_view() const& { return view(); }
  operator std::string_view() const&& = delete;
  const char* begin() const& { return rep->data; }
  const char* end() const& { return rep->data + rep->length; }
  const char* begin() const&& = delete;
  const char* end() const&& = delete;

  // Character i; an index outside 0 to length - 1 fails an assertion.
  char operator[](std::int32_t i) const;

  // The place of character i for writing, unshared first, so that reading
  // through it costs the sharing too.  The same bounds.
  char& at(std::int32_t i);

  // Checks the representation's invariant, as nearly every operation does
  // first; a broken one fails an assertion.
  bool check() const { return ZX_ASSERT(is_sound(*rep)); }

  // ---- comparing: equal are texts of the same length and bytes; the order
  // is that of the first byte that differs, as an unsigned number, and a text
  // comes ahead of its continuations.  Null text fails an assertion.
  friend bool operator==(const zxStr& a, const zxStr& b) {
    return b.check() && a.equals(b.c_str(), b.length());
  }
  bool operator==(const char* text) const;
  bool operator==(char byte) const;
  friend std::strong_ordering operator<=>(const zxStr& a, const zxStr& b) {
    return b.check() ? a.order(b.view()) : std::strong_ordering::equal;
  }
  std::strong_ordering operator<=>(const char* text) const;

  // ---- sizing
  // Makes room for n characters; never gives room back.  Negative n fails an
  // assertion.  A shared string becomes unshared if it has to grow; n of 0 on
  // an empty one of its own gives its block back.
  void reserve(std::int32_t n);

  // Cuts or widens to n characters; new ones are NUL.  Widening beyond the
  // capacity takes n + 64.  Does nothing at all if n is the present length.
  void set_length(std::int32_t n);

  // set_length(n), unshared: the place for up to n characters and a NUL.  The
  // caller fills it and calls sync_length().  Null if n was refused.
  char* buffer(std::int32_t n);

  // Sets the length by the first NUL within the capacity, which a caller of
  // buffer() left.
  void sync_length();

  // ---- appending: in place with room for 64 more when the room is used up;
  // a shared string gets a representation of exactly the new length.  The
  // appended text may be a part of this string.
  zxStr& append(char byte) {
    zxStrRep& r = *rep;
    const std::int32_t n = r.length;
    if (!is_sound(r) || r.refs >= 2 || n >= r.capacity) [[unlikely]]
      return append_growing(byte);
    char* end = r.data + zx_wide(n);
    end[0] = byte;
    end[1] = '\0';
    r.length = n + 1;
    return *this;
  }
  zxStr& append(const char* text);
  zxStr& append(const char* characters, std::int32_t length);
  zxStr& append(const zxStr& other);
  zxStr& operator+=(char byte) { return append(byte); }
  zxStr& operator+=(const char* text) { return append(text); }
  zxStr& operator+=(const zxStr& other) { return append(other); }

  // The place behind the text, with room for n more characters in a block that
  // is not shared; it grows as append() makes it.  The caller writes there,
  // not beyond the room, and extend() adds what counts.  Null if n was
  // refused: negative, or beyond what a string can hold.
  char* tail(std::int32_t n) {
    zxStrRep& r = *rep;
    if (!is_sound(r) || r.refs >= 2 || n < 0 || r.capacity - r.length < n)
        [[unlikely]]
      return tail_growing(n);
    return r.data + zx_wide(r.length);
  }
  // Up to n of the last tail().
  void extend(std::int32_t n) {
    rep->length += n;
    rep->data[zx_wide(rep->length)] = '\0';
  }

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

 protected:
  // Takes to a representation inside an object; this string is as the default
  // constructor left it.
  void use_inner(zxStrRep* inner) { rep = inner; }
  // Makes an empty string hold characters that fit its own room.
  void fill_inner(const char* characters, std::int32_t length);

 private:
  friend zxStr operator+(const zxStr& a, const zxStr& b);
  friend zxStr operator+(const zxStr& a, const char* b);
  friend zxStr operator+(const char* a, const zxStr& b);
  friend zxStr operator+(const zxStr& a, char b);
  friend zxStr operator+(char a, const zxStr& b);

  static zxStr joined(const char* a, std::int32_t a_length, const char* b,
                      std::int32_t b_length);
  // A negative length counts as one beyond every capacity.
  static bool is_sound(const zxStrRep& r) {
    return (r.capacity | r.refs) >= 0 && zx_wide(r.length) <= r.capacity &&
           r.data[zx_wide(r.length)] == '\0';
  }
  bool equals(const char* text, std::int32_t size) const;
  std::strong_ordering order(std::string_view text) const;
  void share(const zxStr& other) {
    rep = other.rep;
    ++rep->refs;
  }
  void start(const char* characters, std::int32_t length);
  void build_in_general(const char* a, std::int32_t a_length, const char* b,
                        std::int32_t b_length);
  void release() {
    if (rep->refs != 0 && --rep->refs == 0) zx_realloc(rep, 0);
  }
  zxStr& append_growing(char byte);
  char* tail_growing(std::int32_t n);
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

// A string with room for 100 characters inside the object, for short-lived
// work: texts within that length cost no allocation.  The inner room is
// never shared: a zxStr made or assigned from it copies the characters.
//
// The text leaves the room when it outgrows it, and when text or a byte is
// assigned (that rebuilds, as for every string); from then on the object is
// an ordinary string.  Constructors, assignment from strings of up to 100
// characters, appended bytes up to a length of 100 and appended texts up to a
// length of 99 stay inside.
class zxIStr : public zxStr {
 public:
  static constexpr std::int32_t k_room = 100;

  zxIStr() { start_inside(); }
  zxIStr(const char* text);
  zxIStr(const char* characters, std::int32_t length);
  zxIStr(const zxStr& other) {
    start_inside();
    zxStr::operator=(other);
  }
  zxIStr(const zxIStr& other) : zxIStr(static_cast<const zxStr&>(other)) {}
  zxIStr(zxIStr&& other) noexcept : zxIStr(static_cast<const zxStr&>(other)) {}
  ~zxIStr() = default;

  zxIStr& operator=(const zxIStr& other) {
    if (this != &other) zxStr::operator=(other);
    return *this;
  }
  zxIStr& operator=(zxIStr&& other) noexcept {
    zxStr::operator=(static_cast<zxStr&&>(other));
    return *this;
  }
  using zxStr::operator=;

 private:
  void start_inside() { use_inner(::new (room) zxStrRep{k_room, 0, 0, {}}); }
  void start_with(const char* characters, std::int32_t length);

  alignas(zxStrRep) unsigned char room[offsetof(zxStrRep, data) + k_room + 1];
};

// Concatenation: a new string of exactly the two lengths.  If one side is
// empty the result shares the other where that is a string; the byte forms
// never share.
zxStr operator+(const zxStr& a, const zxStr& b);
zxStr operator+(const zxStr& a, const char* b);
zxStr operator+(const zxStr& a, char b);
zxStr operator+(const char* a, const zxStr& b);
zxStr operator+(char a, const zxStr& b);

// The text without the white space (class k_class_space) at both ends; it
// lies within the given one.
constexpr std::string_view zx_trimmed(std::string_view text) {
  while (!text.empty() && zx_is_space(text.front())) text.remove_prefix(1);
  while (!text.empty() && zx_is_space(text.back())) text.remove_suffix(1);
  return text;
}

// Removes that white space.
void trim(zxStr& text);

// Removes one line feed, and a carriage return ahead of it, from the end.
void strip_line_end(zxStr& text);

// The failure entries for texts held in a string.
void bail_code(std::int32_t number, const zxStr& text,
               const BailDetail& detail = no_detail);
void fatal_exit(const zxStr& text);

// The library's checksum of 16 bits: polynomial 0x1021, the highest bit
// first, from 0xFFFF on, no final inversion.  It is the hash of string keys
// and reaches disk: it never changes.
std::uint16_t crc16(const void* bytes, std::size_t size);
std::uint16_t crc16_add(std::uint16_t crc, const void* bytes, std::size_t size);

// The checksum of 32 bits: the polynomial 0xEDB88320, the lowest bit first,
// from 0xFFFFFFFF on, and no final inversion, so that the result is the
// complement of what others call the CRC-32.  crc32_add() goes on from an
// earlier result, crc32_byte() by a single byte.
std::uint32_t crc32(const void* bytes, std::size_t size);
std::uint32_t crc32_add(std::uint32_t crc, const void* bytes, std::size_t size);
std::uint32_t crc32_byte(std::uint32_t crc, std::uint8_t byte);

#endif  // ZXSTR_H
