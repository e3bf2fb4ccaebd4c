// zxstr2.cpp - parts of a text, searching, prefixes and suffixes, case,
// escapes, splitting.  zxstr2_number.cpp reads numbers.
// Tests: tests/zxlib/zxstr2_test.cpp.
#include "zxstr2.h"

#include <algorithm>
#include <array>
#include <cstring>

#include "zxstrm.h"

zxChars::zxChars(const char* text)
    : zxChars(text, text != nullptr ? zx_count(std::strlen(text)) : 0) {}

zxChars::zxChars(const char* characters, std::int32_t length) {
  if (ZX_ASSERT(characters != nullptr && length >= 0))
    chars = {characters, zx_size(length)};
}

// ----------------------------------------------------------------- parts --

namespace {

// `length` characters from a place on, all of which the text has.
zxStr part_of(const zxStr& text, std::int32_t start, std::int32_t length) {
  if (length == text.length()) return text;
  return length == 0 ? zxStr() : zxStr(text.begin() + start, length);
}

}  // namespace

zxStr rest(const zxStr& text, std::int32_t n) {
  if (!text.check() || !ZX_ASSERT(n >= 0 && n <= text.length())) return {};
  return part_of(text, n, text.length() - n);
}

zxStr sub(const zxStr& text, std::int32_t position, std::int32_t length) {
  if (!text.check()) return {};
  const std::int32_t start = std::max(position, 0);
  if (length <= 0 || start >= text.length()) return {};
  return part_of(text, start, std::min(length, text.length() - start));
}

zxStr from(const zxStr& text, std::int32_t position) {
  return sub(text, position, INT32_MAX);
}

char last_char(zxChars text) {
  const std::string_view chars = text.view();
  return ZX_ASSERT(!chars.empty()) ? chars.back() : '\0';
}

char pop_char(zxStr& text) {
  if (!ZX_ASSERT(!text.is_empty())) return '\0';
  return pop_char_or0(text);
}

char pop_char_or0(zxStr& text) {
  if (!text.check() || text.length() == 0) return '\0';
  const char last = text.end()[-1];
  text.set_length(text.length() - 1);
  return last;
}

// ------------------------------------------------------------- searching --

namespace {

// Where the first of `what`, which is not empty and not longer than `text`,
// begins; null if there is none.
const char* place_of(std::string_view text, std::string_view what) {
  const char* at = text.data();
  const char* const behind_last = at + (text.size() - what.size()) + 1;
  while (at < behind_last) {
    at = static_cast<const char*>(std::memchr(
        at, what.front(), static_cast<std::size_t>(behind_last - at)));
    if (at == nullptr || what.size() == 1) return at;
    if (at[1] == what[1] &&
        std::memcmp(at + 2, what.data() + 2, what.size() - 2) == 0)
      return at;
    ++at;
  }
  return nullptr;
}

}  // namespace

std::int32_t find(zxChars text, std::int32_t position, zxChars what) {
  if (!ZX_ASSERT(position >= 0)) return -1;
  const std::string_view chars = text.view();
  const std::string_view wanted = what.view();
  const std::size_t start = zx_size(position);
  if (start >= chars.size() || chars.size() - start < wanted.size()) return -1;
  if (wanted.empty()) return position;
  const char* place = place_of(chars.substr(start), wanted);
  if (place == nullptr) return -1;
  return zx_count(static_cast<std::size_t>(place - chars.data()));
}
std::int32_t find(zxChars text, std::int32_t position, const char* what,
                  std::int32_t length) {
  return find(text, position, zxChars(what, length));
}
std::int32_t find(zxChars text, zxChars what) { return find(text, 0, what); }

std::int32_t find_char(zxChars text, std::int32_t position, char byte) {
  return find(text, position, zxChars(&byte, 1));
}
std::int32_t find_char(zxChars text, char byte) {
  return find_char(text, 0, byte);
}

bool contains(zxChars text, zxChars what) { return find(text, what) >= 0; }
bool contains(zxChars text, char byte) { return find_char(text, byte) >= 0; }

// ------------------------------------------------- prefixes and suffixes --

namespace {

// True if the first n characters are the same but for the case of letters;
// a NUL in both ends the comparison.
bool is_same_folded(const char* a, const char* b, std::size_t n) {
  for (std::size_t i = 0; i < n; ++i) {
    if (zx_lower(a[i]) != zx_lower(b[i])) return false;
    if (a[i] == '\0') return true;
  }
  return true;
}

}  // namespace

bool starts_with(zxChars text, zxChars start) {
  return text.view().starts_with(start.view());
}
bool starts_with(zxChars text, const char* start, std::int32_t length) {
  return starts_with(text, zxChars(start, length));
}
bool starts_with(zxChars text, char start) {
  return text.view().starts_with(start);
}

bool istarts_with(zxChars text, zxChars start) {
  const std::string_view chars = text.view();
  const std::size_t n = start.view().size();
  return chars.size() >= n &&
         is_same_folded(chars.data(), start.view().data(), n);
}
bool istarts_with(zxChars text, const char* start, std::int32_t length) {
  return istarts_with(text, zxChars(start, length));
}
bool istarts_with(zxChars text, char start) {
  return istarts_with(text, zxChars(&start, 1));
}

bool ends_with(zxChars text, zxChars end) {
  return text.view().ends_with(end.view());
}
bool ends_with(zxChars text, const char* end, std::int32_t length) {
  return ends_with(text, zxChars(end, length));
}
bool ends_with(zxChars text, char end) { return text.view().ends_with(end); }

bool iends_with(zxChars text, zxChars end) {
  const std::string_view chars = text.view();
  const std::size_t n = end.view().size();
  return chars.size() >= n && is_same_folded(chars.data() + (chars.size() - n),
                                             end.view().data(), n);
}
bool iends_with(zxChars text, const char* end, std::int32_t length) {
  return iends_with(text, zxChars(end, length));
}
bool iends_with(zxChars text, char end) {
  return iends_with(text, zxChars(&end, 1));
}

// ------------------------------------------------------------------ case --

void lower(zxStr& text) { text.to_lower(); }
void upper(zxStr& text) { text.to_upper(); }

zxStr lowered(const zxStr& text) {
  zxStr copy = text;
  copy.to_lower();
  return copy;
}

zxStr uppered(const zxStr& text) {
  zxStr copy = text;
  copy.to_upper();
  return copy;
}

// --------------------------------------------------------------- escapes --

namespace {

constexpr char k_escape = '\\';

// The characters that are written as an escape and a letter.
struct NamedByte {
  char byte;
  char letter;
};
constexpr NamedByte k_named_bytes[] = {
    {'\0', '0'}, {'\a', 'a'}, {'\b', 'b'}, {'\t', 't'},
    {'\n', 'n'}, {'\f', 'f'}, {'\r', 'r'},
};

using ByteTable = std::array<char, 256>;

constexpr char& entry(ByteTable& table, char byte) {
  return table[static_cast<unsigned char>(byte)];
}
char entry(const ByteTable& table, char byte) {
  return table[static_cast<unsigned char>(byte)];
}

// What follows the escape of a byte: a letter; k_hexadecimal for the "x" and
// two digits; k_itself if there is no escape.
constexpr char k_itself = '\0';
constexpr char k_hexadecimal = 'x';

constexpr ByteTable make_escapes(std::string_view escaped) {
  ByteTable table{};
  for (char byte = 0; byte < 32; ++byte) entry(table, byte) = k_hexadecimal;
  for (const NamedByte& named : k_named_bytes)
    entry(table, named.byte) = named.letter;
  for (const char byte : escaped) entry(table, byte) = byte;
  return table;
}
constexpr ByteTable k_escapes = make_escapes("\"'\\");
constexpr ByteTable k_escapes_with_tilde = make_escapes("\"'\\~");

// The byte that a letter stands for behind the escape.
char byte_of(char letter) {
  for (const NamedByte& named : k_named_bytes)
    if (named.letter == letter) return named.byte;
  return letter;
}

// How long a text becomes by escapes.
std::int64_t escaped_size(std::string_view text, const ByteTable& escapes) {
  std::int64_t size = 0;
  for (const char byte : text) {
    const char escape = entry(escapes, byte);
    size += escape == k_itself ? 1 : escape == k_hexadecimal ? 4 : 2;
  }
  return size;
}

// Writes a byte as it is escaped; the place behind it.
char* put_escaped(char* to, char byte, char escape) {
  if (escape == k_itself) {
    *to++ = byte;
    return to;
  }
  *to++ = k_escape;
  *to++ = escape;
  if (escape == k_hexadecimal) {
    *to++ = "0123456789ABCDEF"[byte >> 4];
    *to++ = "0123456789ABCDEF"[byte & 15];
  }
  return to;
}

// The escape at the beginning of a text, which is k_escape: the byte that it
// stands for, and how long it is.  Length 1: it is the last character, and
// stands for nothing.
struct Escape {
  explicit Escape(std::string_view text)
      : length(std::min<std::size_t>(
            text.size(), text.size() > 1 && text[1] == 'x' ? 4 : 2)) {
    if (length == 1) return;
    byte = text[1] == 'x'
               ? static_cast<char>(parse_hex(text.substr(2, length - 2)))
               : byte_of(text[1]);
  }

  std::size_t length;
  char byte = '\0';
};

// Calls for each run of characters that stand for themselves and for each
// escape behind it.
template <class OnRun, class OnEscape>
void read_escapes(std::string_view text, OnRun on_run, OnEscape on_escape) {
  for (;;) {
    const std::size_t place = text.find(k_escape);
    on_run(text.substr(0, place));
    if (place == std::string_view::npos) return;
    text.remove_prefix(place);
    const Escape escape(text);
    if (escape.length > 1) on_escape(escape.byte);
    text.remove_prefix(escape.length);
  }
}

// The place for exactly n characters in an empty string; null if that was
// refused.
char* room_for(zxStr& text, std::int64_t n) {
  if (!ZX_ASSERT(n <= INT32_MAX)) return nullptr;
  text.reserve(static_cast<std::int32_t>(n));
  return text.buffer(static_cast<std::int32_t>(n));
}

}  // namespace

zxStr escape(const zxStr& text, bool tilde) {
  if (!text.check()) return {};
  const ByteTable& escapes = tilde ? k_escapes_with_tilde : k_escapes;
  const std::int64_t size = escaped_size(text, escapes);
  if (size == text.length()) return text;
  zxStr result;
  char* to = room_for(result, size);
  if (to == nullptr) return {};
  for (const char byte : text) to = put_escaped(to, byte, entry(escapes, byte));
  return result;
}

zxStr unescape(const zxStr& text) {
  if (!contains(text, k_escape)) return text;
  std::int64_t size = 0;
  read_escapes(
      text,
      [&](std::string_view run) {
        size += static_cast<std::int64_t>(run.size());
      },
      [&](char) { ++size; });
  zxStr result;
  char* to = room_for(result, size);
  if (to == nullptr) return {};
  read_escapes(
      text,
      [&](std::string_view run) { to = std::copy(run.begin(), run.end(), to); },
      [&](char byte) { *to++ = byte; });
  return result;
}

// ------------------------------------------------------------- splitting --

namespace {

class Splitting {
 public:
  Splitting(zxQVA<zxStr>& its_out, const zxStr& its_text, bool keeps_empty)
      : out(its_out), text(its_text), keep_empty(keeps_empty) {}

  // Adds pieces up to the limit, and what is left of the text.
  void run(const zxRegex& regex, std::int64_t limit) {
    while (out.length() < limit && at != text.end() && finds_next(regex)) {
      add(at, zx_match.start[0]);
      for (int n = 1; n <= k_regex_groups && out.length() < limit; ++n)
        add_group(n);
      at = zx_match.end[0];
    }
    if (at != text.end())
      out.append(rest(text, static_cast<std::int32_t>(at - text.begin())));
  }

 private:
  // An empty match where the search began would be found for ever.
  bool finds_next(const zxRegex& regex) const {
    if (!finds_from(at, regex)) return false;
    return zx_match.end[0] != at || finds_from(at + 1, regex);
  }

  bool finds_from(const char* place, const zxRegex& regex) const {
    const char before = place == text.begin() ? '\0' : place[-1];
    return regexec_from(&regex, place, text.end(), before);
  }

  void add_group(int n) {
    if (zx_match.start[n] != nullptr && zx_match.end[n] != nullptr)
      add(zx_match.start[n], zx_match.end[n]);
  }

  void add(const char* start, const char* end) {
    if (start != end)
      out.append(zxStr(start, static_cast<std::int32_t>(end - start)));
    else if (keep_empty)
      out.append(zxStr());
  }

  zxQVA<zxStr>& out;
  const zxStr& text;
  const bool keep_empty;
  const char* at = text.begin();  // what is ahead of it is done
};

}  // namespace

std::int32_t split_regex(zxQVA<zxStr>& out, const zxStr& text,
                         const char* pattern, std::int32_t pattern_length,
                         std::int32_t max, bool keep_empty) {
  // Text and pattern may be kept by an element that goes away.
  const zxStr held = text;
  const zxRegex* regex = get_regex(pattern, pattern_length);
  out.set_length(0);
  if (regex == nullptr) return 0;
  Splitting(out, held, keep_empty).run(*regex, std::int64_t{max} - 1);
  zx_match = zxMatch{};  // it would lead into a text that may be gone
  return out.length();
}

std::int32_t split_regex(zxQVA<zxStr>& out, const zxStr& text,
                         const zxStr& pattern, std::int32_t max,
                         bool keep_empty) {
  const zxStr held = pattern;
  forget(held.c_str());
  return split_regex(out, text, held.c_str(), held.length(), max, keep_empty);
}
