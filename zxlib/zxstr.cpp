// zxstr.cpp - the string class.
// Tests: tests/zxlib/zxstr_test.cpp.
#include "zxstr.h"

#include <climits>
#include <cstring>

namespace {

// What append and set_length take beyond the length asked for.
constexpr std::int32_t k_margin = 64;
// Bytes of a block beyond its capacity: three counts, the NUL, three spare.
constexpr std::size_t k_overhead = 16;

std::size_t block_size(std::int32_t capacity) {
  return zx_size(capacity) + k_overhead;
}

zxStrRep* new_block(std::int32_t capacity) {
  void* block = zx_realloc(nullptr, block_size(capacity));
  return ::new (block) zxStrRep{capacity, 1, 0, {'\0'}};
}

// The sum of two lengths, or -1 if no string can be that long.
std::int32_t sum_of(std::int32_t a, std::int32_t b) {
  const std::int64_t sum = std::int64_t{a} + b;
  return sum > INT32_MAX ? -1 : static_cast<std::int32_t>(sum);
}

// Sets the characters of a block that is large enough for both pieces; `a`
// may lie within it.
void fill(zxStrRep* rep, const char* a, std::int32_t a_length, const char* b,
          std::int32_t b_length) {
  zx_copy(rep->data, a, zx_size(a_length));
  zx_copy(rep->data + a_length, b, zx_size(b_length));
  rep->length = a_length + b_length;
  rep->data[rep->length] = '\0';
}

// A place that may be written to when the right one is out of reach.
char& scratch_byte() {
  static char byte;
  byte = '\0';
  return byte;
}

}  // namespace

constinit zxStrRep zx_empty_rep = {0, 0, 0, {'\0'}};

// ---- representation

bool zxStr::is_within(const char* place) const {
  const auto start = reinterpret_cast<std::uintptr_t>(rep->data);
  const auto at = reinterpret_cast<std::uintptr_t>(place);
  return at >= start && at - start <= zx_size(rep->capacity);
}

// Moves the characters into a new block of capacity n, of this string alone.
void zxStr::take_exactly(std::int32_t n) {
  zxStrRep* fresh = new_block(n);
  zx_copy(fresh->data, rep->data, zx_size(rep->length) + 1);
  fresh->length = rep->length;
  release();
  rep = fresh;
}

// Changes the capacity of a block that is this string's alone.
void zxStr::resize_block(std::int32_t n) {
  rep = static_cast<zxStrRep*>(zx_realloc(rep, block_size(n)));
  rep->capacity = n;
}

void zxStr::unshare() {
  if (!check()) return;
  if (rep->refs >= 2) take_exactly(rep->length);
}

void zxStr::clear() {
  if (!check()) return;
  if (rep->refs != 0) {
    release();
    rep = &zx_empty_rep;
  } else if (rep->length != 0) {
    rep->length = 0;
    rep->data[0] = '\0';
  }
}

// ---- making and assigning

// The first block of a string.
inline void zxStr::start(const char* characters, std::int32_t length) {
  if (!ZX_ASSERT(characters != nullptr && length >= 0)) return;
  rep = new_block(length);
  fill(rep, characters, length, nullptr, 0);
}

zxStr::zxStr(const char* text) : zxStr() {
  start(text, text != nullptr ? zx_count(std::strlen(text)) : 0);
}

zxStr::zxStr(const char* characters, std::int32_t length) : zxStr() {
  start(characters, length);
}

zxStr::zxStr(char byte) : zxStr(&byte, 1) {}

zxStr::zxStr(std::string_view text)
    : zxStr(text.empty() ? "" : text.data(), zx_count(text.size())) {}

zxStr& zxStr::operator=(const zxStr& other) {
  if (this == &other) return *this;
  if (!check() || !other.check() || rep == other.rep) return *this;
  if (other.rep->length == 0) {
    clear();
  } else if (rep->refs == 0 && rep->capacity >= other.rep->length) {
    std::memcpy(rep->data, other.rep->data, zx_size(other.rep->length) + 1);
    rep->length = other.rep->length;
  } else if (other.rep->refs == 0) {
    build(other.rep->data, other.rep->length);
  } else {
    ++other.rep->refs;
    release();
    rep = other.rep;
  }
  return *this;
}

// A block that is not counted lies inside some string object or is the
// shared empty one: it is copied, never taken.  An empty source clears.
zxStr& zxStr::operator=(zxStr&& other) noexcept {
  if (!check() || !other.check()) return *this;
  const bool inner_room = rep->refs == 0 && rep != &zx_empty_rep;
  if (inner_room || other.rep->refs == 0 || other.rep->length == 0)
    return *this = other;
  if (rep == other.rep) return *this;
  release();
  rep = other.rep;
  other.rep = &zx_empty_rep;
  return *this;
}

zxStr& zxStr::operator=(const char* text) {
  if (!check() || !ZX_ASSERT(text != nullptr)) return *this;
  build(text, zx_count(std::strlen(text)));
  return *this;
}

zxStr& zxStr::operator=(char byte) {
  build(&byte, 1);
  return *this;
}

void zxStr::build(const char* a, std::int32_t a_length, const char* b,
                  std::int32_t b_length) {
  // One text into a block of the string's own that holds it: the usual case
  // of a string that is used again and again.
  const bool is_simple = is_sound(*rep) && rep->refs == 1 && b_length == 0 &&
                         a != nullptr && a_length >= 0 &&
                         a_length <= rep->capacity;
  if (!is_simple) return build_in_general(a, a_length, b, b_length);
  zx_copy(rep->data, a, zx_size(a_length));
  rep->length = a_length;
  rep->data[a_length] = '\0';
}

[[gnu::noinline]] void zxStr::build_in_general(const char* a,
                                               std::int32_t a_length,
                                               const char* b,
                                               std::int32_t b_length) {
  if (!check() || !ZX_ASSERT(b != nullptr || b_length == 0) ||
      !ZX_ASSERT(a != nullptr && a_length >= 0 && b_length >= 0))
    return;
  const std::int32_t sum = sum_of(a_length, b_length);
  if (!ZX_ASSERT(sum >= 0)) return;

  // The string's own characters can be moved to its start in place; anything
  // else that involves them is put together in a block beside.
  const bool b_is_own = b_length > 0 && is_within(b);
  const bool grows = rep->capacity < sum;
  if (rep->refs != 1 || b_is_own || (grows && is_within(a))) {
    const bool keeps_room = rep->refs == 1 && !grows;
    zxStrRep* fresh = new_block(keeps_room ? rep->capacity : sum);
    fill(fresh, a, a_length, b, b_length);
    release();
    rep = fresh;
  } else {
    if (grows) resize_block(sum);
    fill(rep, a, a_length, b, b_length);
  }
}

// ---- reading

char zxStr::operator[](std::int32_t i) const {
  if (!check() || !ZX_ASSERT(i >= 0 && i < rep->length)) return '\0';
  return rep->data[i];
}

char& zxStr::at(std::int32_t i) {
  if (!check() || !ZX_ASSERT(i >= 0 && i < rep->length)) return scratch_byte();
  unshare();
  return rep->data[i];
}

bool zxStr::equals(const char* text, std::int32_t size) const {
  return check() && rep->length == size &&
         std::memcmp(rep->data, text, zx_size(size)) == 0;
}

bool zxStr::operator==(const char* text) const {
  if (!ZX_ASSERT(text != nullptr)) return false;
  return equals(text, zx_count(std::strlen(text)));
}

bool zxStr::operator==(char byte) const { return equals(&byte, 1); }

std::strong_ordering zxStr::order(std::string_view text) const {
  if (!check()) return std::strong_ordering::equal;
  return view() <=> text;
}

std::strong_ordering zxStr::operator<=>(const char* text) const {
  if (!ZX_ASSERT(text != nullptr)) return std::strong_ordering::equal;
  return order(text);
}

void zxStr::copy_to(char* out, std::int32_t size) const {
  if (!check() || !ZX_ASSERT(out != nullptr && size > rep->length)) return;
  std::memcpy(out, rep->data, zx_size(rep->length) + 1);
}

// ---- the form with room inside

void zxStr::fill_inner(const char* characters, std::int32_t length) {
  fill(rep, characters, length, nullptr, 0);
}

zxIStr::zxIStr(const char* text) {
  start_with(text, text != nullptr ? zx_count(std::strlen(text)) : 0);
}

zxIStr::zxIStr(const char* characters, std::int32_t length) {
  start_with(characters, length);
}

void zxIStr::start_with(const char* characters, std::int32_t length) {
  start_inside();
  if (characters != nullptr && zx_wide(length) <= k_room)
    fill_inner(characters, length);
  else
    build(characters, length);  // which refuses what is no text
}

// ---- sizing

void zxStr::reserve(std::int32_t n) {
  if (!check() || !ZX_ASSERT(n >= 0)) return;
  if (n < rep->length) return;
  if (rep->refs != 0 && n == 0) {
    clear();
  } else if (rep->capacity < n) {
    make_room(n);
  }
}

// Gives the string a block of its own with capacity n, which is above the
// present capacity.
void zxStr::make_room(std::int32_t n) {
  if (rep->refs == 1)
    resize_block(n);
  else
    take_exactly(n);
}

void zxStr::set_length(std::int32_t n) {
  if (!check() || !ZX_ASSERT(n >= 0)) return;
  if (n == rep->length) return;
  const std::int32_t with_margin = sum_of(n, k_margin);
  if (!ZX_ASSERT(with_margin >= 0)) return;
  if (rep->refs >= 2) take_exactly(rep->length);
  if (n > rep->capacity) make_room(with_margin);
  if (n > rep->length)
    std::memset(rep->data + rep->length, 0, zx_size(n - rep->length));
  rep->length = n;
  rep->data[n] = '\0';
}

char* zxStr::buffer(std::int32_t n) {
  set_length(n);
  if (rep->length != n) return nullptr;  // a failure that was dropped
  unshare();
  return rep->data;
}

void zxStr::sync_length() {
  if (!check()) return;
  const void* end = std::memchr(rep->data, '\0', zx_size(rep->capacity) + 1);
  if (!ZX_ASSERT(end != nullptr)) return;
  const auto length =
      static_cast<std::int32_t>(static_cast<const char*>(end) - rep->data);
  if (length == rep->length) return;
  unshare();
  rep->length = length;
}

// ---- appending

zxStr& zxStr::append_growing(char byte) {
  if (!check()) return *this;
  const std::int32_t old_length = rep->length;
  if (rep->refs >= 2) {
    build(rep->data, old_length, &byte, 1);
    return *this;
  }
  const std::int32_t wanted = sum_of(old_length, k_margin);
  if (!ZX_ASSERT(wanted >= 0)) return *this;
  make_room(wanted);
  rep->data[old_length] = byte;
  rep->data[++rep->length] = '\0';
  return *this;
}

char* zxStr::tail_growing(std::int32_t n) {
  if (!ZX_ASSERT(n >= 0)) return nullptr;
  const std::int64_t wanted = zx_wide(rep->length) + n + k_margin;
  if (!check() || !ZX_ASSERT(wanted <= INT32_MAX)) return nullptr;
  if (rep == &zx_empty_rep)
    rep = new_block(static_cast<std::int32_t>(wanted));
  else if (rep->length + n <= rep->capacity)
    unshare();
  else
    make_room(static_cast<std::int32_t>(wanted));
  return rep->data + rep->length;
}

zxStr& zxStr::append(const char* characters, std::int32_t size) {
  if (!check() || !ZX_ASSERT(characters != nullptr && size >= 0)) return *this;
  const std::int32_t old_length = rep->length;
  const std::int32_t sum = sum_of(old_length, size);
  if (!ZX_ASSERT(sum >= 0)) return *this;
  if (rep->refs >= 2) {
    build(rep->data, old_length, characters, size);
    return *this;
  }
  if (sum >= rep->capacity) {
    const std::int32_t wanted = sum_of(sum, k_margin);
    if (!ZX_ASSERT(wanted >= 0)) return *this;
    const bool own_text = is_within(characters);
    const std::ptrdiff_t offset = own_text ? characters - rep->data : 0;
    make_room(wanted);
    if (own_text) characters = rep->data + offset;
  }
  zx_copy(rep->data + old_length, characters, zx_size(size));
  rep->length = sum;
  rep->data[sum] = '\0';
  return *this;
}

zxStr& zxStr::append(const char* text) {
  if (!ZX_ASSERT(text != nullptr)) return *this;
  return append(text, zx_count(std::strlen(text)));
}

zxStr& zxStr::append(const zxStr& other) {
  if (!other.check()) return *this;
  return append(other.rep->data, other.rep->length);
}

// ---- letters and numbers

template <class Fold>
void zxStr::fold_case(Fold fold) {
  if (!check()) return;
  const char* place = begin();
  while (place < end() && fold(*place) == *place) ++place;
  const std::ptrdiff_t unchanged = place - begin();
  if (unchanged == rep->length) return;
  unshare();
  const char* const last = end();
  for (char* byte = rep->data + unchanged; byte < last; ++byte)
    *byte = fold(*byte);
}

void zxStr::to_upper() { fold_case(zx_upper); }
void zxStr::to_lower() { fold_case(zx_lower); }

namespace {

// What a last letter multiplies by; 1 for any other byte.
std::int32_t factor_of(char suffix) {
  switch (zx_lower(suffix)) {
    case 'k':
      return 1000;
    case 'm':
      return 1000000;
    default:
      return 1;
  }
}

// True if byte i of the digits is a comma that belongs to the number.
bool is_inner_comma(std::string_view text, std::size_t i) {
  return text[i] == ',' && i > 0 && i + 1 < text.size() &&
         zx_is_digit(text[i - 1]) && zx_is_digit(text[i + 1]);
}

// The value of digits with inner commas; -1 if the text is anything else or
// the value does not fit.
std::int64_t unsigned_value(std::string_view text) {
  std::int64_t value = 0;
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (value != 0 && is_inner_comma(text, i)) continue;
    if (!zx_is_digit(text[i])) return -1;
    value = value * 10 + (text[i] - '0');
    if (value > INT32_MAX) return -1;
  }
  return value;
}

}  // namespace

std::int32_t zxStr::to_int() const {
  if (!check()) return 0;
  std::string_view text = zx_trimmed(view());
  if (text.empty()) return 0;
  const bool negative = text.front() == '-';
  if (negative || text.front() == '+') text.remove_prefix(1);
  const std::int32_t factor = text.empty() ? 1 : factor_of(text.back());
  if (factor != 1) text.remove_suffix(1);
  const std::int64_t value = unsigned_value(text) * factor;
  if (value < 0 || value > INT32_MAX) return 0;
  return static_cast<std::int32_t>(negative ? -value : value);
}

// ---- concatenation

zxStr zxStr::joined(const char* a, std::int32_t a_length, const char* b,
                    std::int32_t b_length) {
  zxStr result;
  const std::int32_t sum = sum_of(a_length, b_length);
  if (!ZX_ASSERT((a_length | b_length | sum) >= 0)) return result;
  result.rep = new_block(sum);
  fill(result.rep, a, a_length, b, b_length);
  return result;
}

zxStr operator+(const zxStr& a, const zxStr& b) {
  if (!a.check() || !b.check()) return {};
  if (a.length() == 0) return b;
  if (b.length() == 0) return a;
  return zxStr::joined(a.c_str(), a.length(), b.c_str(), b.length());
}

zxStr operator+(const zxStr& a, const char* b) {
  if (!a.check()) return {};
  if (!ZX_ASSERT(b != nullptr) || *b == '\0') return a;
  return zxStr::joined(a.c_str(), a.length(), b, zx_count(std::strlen(b)));
}

zxStr operator+(const char* a, const zxStr& b) {
  if (!b.check()) return {};
  if (!ZX_ASSERT(a != nullptr) || *a == '\0') return b;
  return zxStr::joined(a, zx_count(std::strlen(a)), b.c_str(), b.length());
}

zxStr operator+(const zxStr& a, char b) {
  if (!a.check()) return {};
  return zxStr::joined(a.c_str(), a.length(), &b, 1);
}

zxStr operator+(char a, const zxStr& b) {
  if (!b.check()) return {};
  return zxStr::joined(&a, 1, b.c_str(), b.length());
}

void trim(zxStr& text) {
  if (!text.check()) return;
  const std::string_view kept = zx_trimmed(text.view());
  const std::int32_t length = zx_count(kept.size());
  if (length == 0) return text.clear();
  if (length < text.length()) text.build(kept.data(), length);
}

void strip_line_end(zxStr& text) {
  if (!text.check() || !text.view().ends_with('\n')) return;
  std::int32_t length = text.length() - 1;
  if (length > 0 && text[length - 1] == '\r') --length;
  text.set_length(length);
}

void bail_code(std::int32_t number, const zxStr& text,
               const BailDetail& detail) {
  bail_code(number, text.c_str(), detail);
}

void fatal_exit(const zxStr& text) { fatal_exit(text.c_str()); }
