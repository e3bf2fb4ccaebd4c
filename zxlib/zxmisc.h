// zxmisc.h - the ground floor: source positions, the allocator slot, the
// class table of bytes, checked casts, relocatable types.
//
// Everything here is constant-initialised and may be used from static
// constructors.  Process-wide state: zx_pos, zx_realloc, traits.
#ifndef ZXMISC_H
#define ZXMISC_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>

// ------------------------------------------------------ source positions --

// A place in the source.  `file` is not owned and usually a literal.
struct zxPos {
  const char* file = nullptr;
  std::int32_t line = 0;
};

// The current position, stored ahead of calls that can fail (ZX_HERE) so
// that a failure can name the place of its cause.
extern zxPos zx_pos;

// The text "file:line" of a position, in a static buffer that the next call
// overwrites.  A null file is made to point at "?".  A name of 21 bytes or
// more loses an ending ".cpp" in any case and is cut to its last 20 bytes,
// with "~" over the first that stays.
const char* pos_string(zxPos& position);

// The name of a source file without its folders.
constexpr const char* zx_base_name(const char* path) {
  const char* base = path;
  for (const char* p = path; *p; ++p)
    if (*p == '/' || *p == '\\') base = p + 1;
  return base;
}

// The flat name of a source module: the file's name without folders and
// ending, as in "zxstr".
template <std::size_t N>
struct zxModuleWord {
  char text[N] = {};
  consteval explicit zxModuleWord(const char (&path)[N]) {
    const char* base = zx_base_name(path);
    for (std::size_t i = 0; base[i] && base[i] != '.'; ++i) text[i] = base[i];
  }
};

// The word of the module that this stands in, as a text that lives for ever;
// a template argument and not a local variable, so that all inline copies of
// a function share it.
template <zxModuleWord word>
constexpr const char* zx_module_text() {
  return word.text;
}
#define ZX_MODULE zx_module_text<zxModuleWord{__FILE__}>()

// Stores this place in zx_pos; stands ahead of a call that can fail, as in
//   ZX_HERE;
//   bailf("no such table #", name);
#define ZX_HERE (zx_pos = zxPos{zx_base_name(__FILE__), __LINE__})

// --------------------------------------------------------- program traits --

// The build traits of the program, which the application defines:
// k_trait_console and k_trait_executable make up a console program's 6.
extern std::uint32_t traits;
inline constexpr std::uint32_t k_trait_console = 1U << 1;
inline constexpr std::uint32_t k_trait_executable = 1U << 2;

// ------------------------------------------------------------- allocation --

// The slot through which all memory of strings and containers is taken,
// resized and given back: (null, size) allocates, (block, size) resizes,
// (block, 0) frees.  The result is not tested by callers.
//
// A module has a copy of the library of its own, yet its strings must come
// from the heap of the program that loads it: the slot of the module is set
// to the program's function when the module starts.
using zxReallocFunction = void* (*)(void* block, std::size_t size);
extern zxReallocFunction zx_realloc;

// What stands in the slot at first: the heap.  Exhaustion ends the process
// with message 2000.  In a module whose library has not been started yet, a
// static object is asking too early: a box says so, and the process ends
// with exit code 9.
void* zx_heap_realloc(void* block, std::size_t size);

// What stands in a module's slot behind the library's shutdown, when the
// heap may be gone: it gives nothing (null), and for a block a box says so.
void* zx_realloc_after_cleanup(void* block, std::size_t size);

// Set when the library has been started.
extern bool zx_is_started;

// True if objects of type T may be moved by copying their bytes, the old
// place being forgotten without a destructor.  Types with constructors of
// their own that keep no pointer into themselves declare it:
//   template <> inline constexpr bool zx_relocatable<MyType> = true;
template <class T>
inline constexpr bool zx_relocatable = std::is_trivially_copyable_v<T>;

// ---------------------------------------------------------- byte classes --

inline constexpr unsigned k_class_space = 0x01;    // blank, 9 to 13
inline constexpr unsigned k_class_digit = 0x02;    // 0 to 9
inline constexpr unsigned k_class_upper = 0x04;    // A to Z
inline constexpr unsigned k_class_lower = 0x08;    // a to z
inline constexpr unsigned k_class_hebrew = 0x10;   // 224 to 250 (1255)
inline constexpr unsigned k_class_control = 0x20;  // 0 to 31, 127
inline constexpr unsigned k_class_punct = 0x40;    // ASCII punctuation
inline constexpr unsigned k_class_hebdos = 0x80;   // 128 to 154 (862)
inline constexpr unsigned k_class_latin = k_class_upper | k_class_lower;

namespace zxmisc_detail {
constexpr std::uint8_t class_of(int byte) {
  auto within = [byte](int low, int high) {
    return byte >= low && byte <= high;
  };
  unsigned bits = 0;
  if (within(9, 13) || byte == 32) bits |= k_class_space;
  if (within('0', '9')) bits |= k_class_digit;
  if (within('A', 'Z')) bits |= k_class_upper;
  if (within('a', 'z')) bits |= k_class_lower;
  if (within(224, 250)) bits |= k_class_hebrew;
  if (within(0, 31) || byte == 127) bits |= k_class_control;
  if (within(33, 126) && !(bits & (k_class_digit | k_class_latin)))
    bits |= k_class_punct;
  if (within(128, 154)) bits |= k_class_hebdos;
  return static_cast<std::uint8_t>(bits);
}
constexpr std::array<std::uint8_t, 256> make_classes() {
  std::array<std::uint8_t, 256> table{};
  for (int i = 0; i < 256; ++i)
    table[static_cast<std::size_t>(i)] = class_of(i);
  return table;
}
}  // namespace zxmisc_detail

// The class bits of each byte; they serve in place of the standard
// character tests throughout.
inline constexpr std::array<std::uint8_t, 256> zxCharClass =
    zxmisc_detail::make_classes();

// True if the byte has one of the class bits.
constexpr bool zx_is(char byte, unsigned class_bits) {
  return (zxCharClass[static_cast<unsigned char>(byte)] & class_bits) != 0;
}
constexpr bool zx_is_digit(char byte) { return zx_is(byte, k_class_digit); }
constexpr bool zx_is_space(char byte) { return zx_is(byte, k_class_space); }

// The other case of an ASCII letter; every other byte unchanged.
constexpr char zx_upper(char byte) {
  return zx_is(byte, k_class_lower) ? static_cast<char>(byte - 32) : byte;
}
constexpr char zx_lower(char byte) {
  return zx_is(byte, k_class_upper) ? static_cast<char>(byte + 32) : byte;
}

// ----------------------------------------------------------------- bytes --

namespace zxmisc_detail {
// Copies `size` bytes as two overlapping pieces.
template <std::size_t piece>
void copy_ends(char* to, const char* from, std::size_t size) {
  char first[piece], last[piece];
  std::memcpy(first, from, piece);
  std::memcpy(last, from + size - piece, piece);
  std::memcpy(to, first, piece);
  std::memcpy(to + size - piece, last, piece);
}
}  // namespace zxmisc_detail

// Copies text that is short most of the time, when a call would take as long
// as the copying.  The two places may overlap.
inline void zx_copy(char* to, const char* from, std::size_t size) {
  if (size > 32)
    std::memmove(to, from, size);
  else if (size >= 16)
    zxmisc_detail::copy_ends<16>(to, from, size);
  else if (size >= 8)
    zxmisc_detail::copy_ends<8>(to, from, size);
  else if (size >= 4)
    zxmisc_detail::copy_ends<4>(to, from, size);
  else if (size >= 2)
    zxmisc_detail::copy_ends<2>(to, from, size);
  else if (size == 1)
    *to = *from;
}

// ---------------------------------------------------------- checked casts --

// A length as the library's signed 32-bit count; -1 if it does not fit, so
// that the checks on negative lengths catch it.
constexpr std::int32_t zx_count(std::size_t length) {
  return length > 0x7FFFFFFFU ? -1 : static_cast<std::int32_t>(length);
}

// A count that is known not to be negative, as a size.
constexpr std::size_t zx_size(std::int32_t count) {
  return static_cast<std::size_t>(count);
}

// The same for sums that must not overflow.  The detour over an unsigned
// number saves the extension of the sign, which is slow behind a store.
constexpr std::int64_t zx_wide(std::int32_t count) {
  return static_cast<std::int64_t>(static_cast<std::uint32_t>(count));
}

#endif  // ZXMISC_H
