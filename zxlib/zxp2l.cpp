// zxp2l.cpp - Hebrew reordering.
// Tests: tests/zxlib/zxp2l_test.cpp.
#include "zxp2l.h"

#include <algorithm>
#include <climits>
#include <cstring>
#include <string_view>

#include "zxplat.h"

namespace {

constexpr char k_ltr_mark = static_cast<char>(253);
constexpr char k_rtl_mark = static_cast<char>(254);
// The distance of the Hebrew letters of code page 1255 from those of 862.
constexpr int k_dos_distance = 96;

// ---- kinds of bytes

constexpr std::uint8_t k_latin_letter = 0x01;
constexpr std::uint8_t k_hebrew_letter = 0x02;
constexpr std::uint8_t k_ltr_strong = 0x04;  // Latin letters, byte 253
constexpr std::uint8_t k_rtl_strong = 0x08;  // Hebrew letters, byte 254
constexpr std::uint8_t k_digit = 0x10;
constexpr std::uint8_t k_separator = 0x20;  // holds digits together
// What is not simply written when a run is reversed: from its end on what may
// end a number and the mark that is dropped, from its start on what may start
// a number.
constexpr std::uint8_t k_care_at_end = 0x40;
constexpr std::uint8_t k_care_at_start = 0x80;
constexpr std::uint8_t k_strong = k_ltr_strong | k_rtl_strong;

// Which bytes are Hebrew letters: those of code page 1255, or those of 862
// as well.
enum class Letters : std::uint8_t { ansi, ansi_and_dos };

constexpr std::uint8_t kind_of(char byte, Letters letters) {
  const unsigned hebrew_classes = letters == Letters::ansi
                                      ? k_class_hebrew
                                      : k_class_hebrew | k_class_hebdos;
  constexpr std::string_view k_separators = ",/:+-.";
  if (byte == k_ltr_mark) return k_ltr_strong;
  if (byte == k_rtl_mark) return k_rtl_strong | k_care_at_end;
  if (zx_is(byte, k_class_latin)) return k_ltr_strong | k_latin_letter;
  if (zx_is(byte, hebrew_classes)) return k_rtl_strong | k_hebrew_letter;
  if (zx_is_digit(byte)) return k_digit | k_care_at_end | k_care_at_start;
  if (byte == '%') return k_care_at_end;
  if (byte == '$') return k_separator | k_care_at_start;
  return k_separators.find(byte) != std::string_view::npos ? k_separator : 0;
}

template <Letters letters>
constexpr auto make_kinds() {
  std::array<std::uint8_t, 256> kinds{};
  for (int byte = 0; byte < 256; ++byte)
    kinds[static_cast<std::size_t>(byte)] =
        kind_of(static_cast<char>(byte), letters);
  return kinds;
}

template <Letters letters>
constexpr std::array<std::uint8_t, 256> k_kinds = make_kinds<letters>();

template <Letters letters>
bool is(char byte, unsigned kinds) {
  return (k_kinds<letters>[static_cast<unsigned char>(byte)] & kinds) != 0;
}

bool is_digit(char byte) { return is<Letters::ansi>(byte, k_digit); }
bool is_separator(char byte) { return is<Letters::ansi>(byte, k_separator); }

// ---- what bytes become

constexpr char mirrored_bracket(char byte) {
  switch (byte) {
    case '(':
      return ')';
    case ')':
      return '(';
    case '[':
      return ']';
    case ']':
      return '[';
    case '{':
      return '}';
    case '}':
      return '{';
    default:
      return byte;
  }
}

constexpr char to_ansi(char byte) {
  return zx_is(byte, k_class_hebdos) ? static_cast<char>(byte + k_dos_distance)
                                     : byte;
}
constexpr char to_dos(char byte) {
  return zx_is(byte, k_class_hebrew) ? static_cast<char>(byte - k_dos_distance)
                                     : byte;
}

class ByteMap {
 public:
  template <class Map>
  constexpr explicit ByteMap(Map map) {
    for (int byte = 0; byte < 256; ++byte)
      bytes[static_cast<std::size_t>(byte)] = map(static_cast<char>(byte));
  }
  constexpr char operator[](char byte) const {
    return bytes[static_cast<unsigned char>(byte)];
  }

 private:
  std::array<char, 256> bytes{};
};

constexpr ByteMap k_mirror(mirrored_bracket);

// The code page that a conversion gives: in copied runs, and in reversed ones.
struct Target {
  ByteMap copied;
  ByteMap reversed;
};
constexpr Target k_to_ansi = {ByteMap(to_ansi), ByteMap([](char byte) {
                                return to_ansi(mirrored_bracket(byte));
                              })};
constexpr Target k_to_dos = {ByteMap(to_dos), ByteMap([](char byte) {
                               return to_dos(mirrored_bracket(byte));
                             })};

// ---- runs

struct Run {
  std::size_t length;
  bool rtl;
};

template <Letters letters>
std::size_t find_kind(std::string_view text, std::size_t from, unsigned kinds) {
  while (from < text.size() && !is<letters>(text[from], kinds)) ++from;
  return from;
}

// How far a run reaches without the bytes at its end that are of no kind
// among these.
template <Letters letters>
std::size_t up_to_kind(std::string_view run, unsigned kinds) {
  std::size_t length = run.size();
  while (length > 0 && !is<letters>(run[length - 1], kinds)) --length;
  return length;
}

// The run at the start of a text that is not empty.  A run against the base
// gives its neutral end back.
template <Letters letters>
Run split_run(std::string_view text, bool base) {
  const std::size_t strong = find_kind<letters>(text, 0, k_strong);
  if (strong == text.size()) return {text.size(), base};
  const bool rtl = is<letters>(text[strong], k_rtl_strong);
  if (rtl != base && strong > 0) return {strong, base};
  std::size_t end =
      find_kind<letters>(text, strong, rtl ? k_ltr_strong : k_rtl_strong);
  if (rtl != base)
    end = up_to_kind<letters>(text.substr(0, end), k_strong | k_digit);
  return {end, rtl};
}

// The same for physical text, in which a run against the base ends with its
// last letter; without one it is empty.
template <Letters letters>
Run split_physical_run(std::string_view text, bool base) {
  Run run = split_run<letters>(text, base);
  if (run.rtl != base)
    run.length = up_to_kind<letters>(
        text.substr(0, run.length), run.rtl ? k_hebrew_letter : k_latin_letter);
  return run;
}

// ---- reversing

// True if a percent sign behind a number is a part of it; asked once.
bool percent_joins() {
  static const bool joins = !zxplat::process.is_windows_95();
  return joins;
}

// True if a number ends with byte i: a digit, or a percent sign behind one.
bool ends_number(std::string_view run, std::size_t i) {
  if (is_digit(run[i])) return true;
  return run[i] == '%' && i > 0 && is_digit(run[i - 1]) && percent_joins();
}

// Where the number that ends with byte i starts: over digits, over a
// separator that has a digit ahead of it, and a currency sign in front
// unless the run starts with it.
std::size_t number_start(std::string_view run, std::size_t i) {
  while (i > 0) {
    const char before = run[i - 1];
    const bool joins = is_digit(before) ||
                       (is_separator(before) && i > 1 && is_digit(run[i - 2]));
    if (!joins) break;
    --i;
  }
  if (i > 1 && run[i - 1] == '$') --i;
  return i;
}

// Writes a right-to-left run reversed; `out` has room for twice its length.
// With `mark`, a number behind a written currency sign is kept off it by a
// right-to-left mark.  Returns the end of what was written.
char* reverse_run(char* out, std::string_view run, bool mark,
                  const ByteMap& bytes) {
  char* const start = out;
  for (std::size_t i = run.size(); i-- > 0;) {
    const bool needs_care = is<Letters::ansi>(run[i], k_care_at_end);
    if (needs_care && run[i] == k_rtl_mark) continue;
    if (!needs_care || !ends_number(run, i)) {
      *out++ = bytes[run[i]];
      continue;
    }
    const std::size_t first = number_start(run, i);
    if (mark && out > start && out[-1] == '$' && is_digit(run[first]))
      *out++ = k_rtl_mark;
    const std::size_t length = i - first + 1;
    zx_copy(out, run.data() + first, length);
    out += length;
    i = first;
  }
  return out;
}

// ---- composing a line

// The first digit or Hebrew letter of a text, or NUL.  A digit there would
// be read as a part of a Latin run that stands ahead of it.
template <Letters letters>
char leading_anchor(std::string_view text) {
  const std::size_t i = find_kind<letters>(text, 0, k_digit | k_hebrew_letter);
  return i < text.size() ? text[i] : '\0';
}

// Room for a line under composition, twice the length of its source: the
// reversing never exceeds that, a mark for each joint included.
class Room {
 public:
  explicit Room(std::size_t source_length) : size(2 * source_length) {
    if (size > sizeof usual) start = large.tail(zx_count(size));
  }

  char* begin() { return start; }
  char* end() { return start + size; }

 private:
  std::size_t size;
  char usual[512];
  zxStr large;
  char* start = usual;
};

// A line under composition.  Pieces join in front of it or behind it, by the
// base direction.
class Line {
 public:
  Line(Room& its_room, bool base, const Target& its_target)
      : rtl(base),
        target(its_target),
        room(its_room.begin()),
        start(rtl ? its_room.end() : room),
        end(start) {}

  // Adds a run reversed; the piece as it stands in the line.
  std::string_view add_reversed(std::string_view run, bool mark) {
    char* const out = piece_room();
    return join(out, reverse_run(out, run, mark, target.reversed));
  }

  // Adds a run as it is, without the marks if `without_marks`.
  std::string_view add_copied(std::string_view run, bool without_marks) {
    char* const out = piece_room();
    char* out_end = out;
    for (const char byte : run) {
      *out_end = target.copied[byte];
      if (!without_marks || byte != k_ltr_mark) ++out_end;
    }
    return join(out, out_end);
  }

  void add_mark(char mark) {
    char* const out = piece_room();
    *out = mark;
    join(out, out + 1);
  }

  std::string_view view() const {
    return {start, static_cast<std::size_t>(end - start)};
  }

 private:
  // Pieces that join behind the line are written there at once, others by way
  // of the free room ahead of it.
  char* piece_room() const { return rtl ? room : end; }

  std::string_view join(const char* piece, char* piece_end) {
    const auto size = static_cast<std::size_t>(piece_end - piece);
    if (!rtl) {
      end = piece_end;
      return {piece, size};
    }
    start -= size;
    zx_copy(start, piece, size);
    return {start, size};
  }

  bool rtl;
  const Target& target;
  char* room;
  char* start;
  char* end;
};

// Cuts a physical line into runs and adds each to the line.  Marks keep a
// number off the Latin run that comes to stand ahead of it.
void compose_logical(Line& line, std::string_view source, bool base) {
  char anchor = '\0';  // of the whole line, which grows at its front
  while (!source.empty()) {
    const Run run = split_physical_run<Letters::ansi_and_dos>(source, base);
    if (!ZX_ASSERT(run.length > 0)) return;
    const std::string_view piece = source.substr(0, run.length);
    source.remove_prefix(run.length);
    if (!run.rtl && base && is_digit(anchor)) line.add_mark(k_rtl_mark);
    if (!run.rtl && !base && !line.view().empty() &&
        is_digit(leading_anchor<Letters::ansi_and_dos>(piece)))
      line.add_mark(k_ltr_mark);
    const std::string_view added = run.rtl ? line.add_reversed(piece, true)
                                           : line.add_copied(piece, false);
    if (const char found = base ? leading_anchor<Letters::ansi>(added) : '\0')
      anchor = found;
  }
}

// The same for a logical line.
void compose_physical(Line& line, std::string_view source, bool base) {
  while (!source.empty()) {
    const Run run = split_run<Letters::ansi>(source, base);
    if (!ZX_ASSERT(run.length > 0 && run.length <= source.size())) return;
    const std::string_view piece = source.substr(0, run.length);
    source.remove_prefix(run.length);
    if (run.rtl)
      line.add_reversed(piece, false);
    else
      line.add_copied(piece, true);
  }
}

// An empty line takes no memory.
void append_view(zxStr& result, std::string_view text) {
  if (!text.empty()) result.append(text.data(), zx_count(text.size()));
}

// Appends a line that is not too long to be doubled.
void append_logical(zxStr& result, std::string_view source, bool rtl) {
  Room room(source.size());
  Line line(room, rtl, k_to_ansi);
  compose_logical(line, source, rtl);
  append_view(result, line.view());
}

void append_physical(zxStr& result, std::string_view source, bool rtl) {
  Room room(source.size());
  Line line(room, rtl, k_to_dos);
  compose_physical(line, source, rtl);
  append_view(result, line.view());
}

// Splits a text at CR LF and appends each line.
template <class AppendLine>
zxStr convert_lines(const zxStr& text, AppendLine append_line) {
  constexpr std::string_view k_line_end = "\r\n";
  zxStr result;
  std::string_view rest = text.view();
  std::size_t end = rest.find(k_line_end);
  if (end != std::string_view::npos) result.reserve(text.length());
  for (; end != std::string_view::npos; end = rest.find(k_line_end)) {
    append_line(result, rest.substr(0, end));
    result.append("\r\n", 2);
    rest.remove_prefix(end + k_line_end.size());
  }
  append_line(result, rest);
  return result;
}

// Results may take twice a text's length, which must be a length too, with
// the margin that strings grow by.
bool has_room_for_twice(const zxStr& text) {
  constexpr std::int32_t k_margin = 64;
  return ZX_ASSERT(text.length() <= (INT32_MAX - k_margin) / 2);
}

// Moves the bytes of one class by a distance.  A text without any stays
// shared.
void shift_class(zxStr& text, unsigned class_bit, int distance) {
  const auto is_moved = [class_bit](char c) { return zx_is(c, class_bit); };
  const char* const found = std::find_if(text.begin(), text.end(), is_moved);
  if (found == text.end()) return;
  const std::int32_t first = static_cast<std::int32_t>(found - text.begin());
  char* const bytes = &text.at(first) - first;
  for (std::int32_t i = first; i < text.length(); ++i)
    if (is_moved(bytes[i])) bytes[i] = static_cast<char>(bytes[i] + distance);
}

}  // namespace

zxStr logical_from_phys(const zxStr& text, bool rtl) {
  zxStr result;
  if (has_room_for_twice(text)) append_logical(result, text.view(), rtl);
  return result;
}

zxStr phys_from_logical(const zxStr& text, bool rtl) {
  zxStr result;
  if (has_room_for_twice(text)) append_physical(result, text.view(), rtl);
  return result;
}

zxStr logical_from_phys_lines(const zxStr& text, bool rtl) {
  if (!has_room_for_twice(text)) return {};
  return convert_lines(text, [rtl](zxStr& result, std::string_view line) {
    append_logical(result, line, rtl);
  });
}

zxStr phys_from_logical_lines(const zxStr& text, bool rtl) {
  if (!has_room_for_twice(text)) return {};
  return convert_lines(text, [rtl](zxStr& result, std::string_view line) {
    append_physical(result, line, rtl);
  });
}

void dos_to_ansi(zxStr& text) {
  shift_class(text, k_class_hebdos, k_dos_distance);
}

void ansi_to_dos(zxStr& text) {
  shift_class(text, k_class_hebrew, -k_dos_distance);
}

// ---- Unicode

namespace {

using zxp2l_detail::Unit;

class UnitMap {
 public:
  template <class UnitOf>
  constexpr explicit UnitMap(UnitOf unit_of) {
    for (int byte = 0; byte < 256; ++byte)
      units[static_cast<std::size_t>(byte)] = unit_of(byte);
  }
  zxStr encode(const zxStr& text) const;

 private:
  std::array<Unit, 256> units{};
};

zxStr UnitMap::encode(const zxStr& text) const {
  zxStr result;
  if (!has_room_for_twice(text)) return result;
  char* const start = result.tail(2 * text.length());
  char* out = start;
  for (const char byte : text.view()) {
    const Unit& unit = units[static_cast<unsigned char>(byte)];
    std::memcpy(out, unit.bytes, 2);
    out += unit.size;
  }
  result.extend(static_cast<std::int32_t>(out - start));
  return result;
}

constexpr Unit utf16_unit(int code) {
  if (code < 0) return {{}, 0};
  return {{static_cast<char>(code & 0xFF), static_cast<char>(code >> 8)}, 2};
}

constexpr UnitMap k_ansi_to_utf8([](int byte) {
  return zxp2l_detail::utf8_unit(zxp2l_detail::ansi_code(byte));
});
constexpr UnitMap k_ansi_to_utf16([](int byte) {
  return utf16_unit(zxp2l_detail::ansi_code(byte));
});
constexpr UnitMap k_dos_to_utf16([](int byte) {
  return utf16_unit(zxp2l_detail::dos_code(byte));
});

}  // namespace

zxStr dos_to_utf16(const zxStr& text) { return k_dos_to_utf16.encode(text); }

zxStr ansi_to_utf16(const zxStr& text) { return k_ansi_to_utf16.encode(text); }

zxStr ansi_to_utf8(const zxStr& text) { return k_ansi_to_utf8.encode(text); }

// ---- straight to UTF-8
//
// With a right-to-left base each run goes in front of those before it, and a
// reversed run is its bytes one by one in front of each other: so the text
// is read once from its start and the result written once from its end.  The
// marks vanish in UTF-8 and need not be set.

char* zxLogicalExport::put_in_front(char* start, char byte) const {
  const Unit& unit = units[static_cast<unsigned char>(byte)];
  std::memcpy(start - 2, unit.bytes, 2);
  return start - unit.size;
}

char* zxLogicalExport::put_in_front(char* start, std::string_view piece) const {
  for (std::size_t i = piece.size(); i-- > 0;)
    start = put_in_front(start, piece[i]);
  return start;
}

namespace {

// The end of the number that starts with byte i of a right-to-left run, i
// itself if none does: the same numbers that number_start() finds from their
// other end.
std::size_t number_end(std::string_view run, std::size_t i) {
  const std::size_t size = run.size();
  std::size_t end = i;
  if (run[i] == '$' && i > 0 && i + 1 < size) ++end;
  if (!is_digit(run[end])) return i;
  for (;; ++end) {
    while (end < size && is_digit(run[end])) ++end;
    const bool joins =
        end + 1 < size && is_separator(run[end]) && is_digit(run[end + 1]);
    if (!joins) break;
  }
  if (end < size && run[end] == '%' && percent_joins()) ++end;
  return end;
}

}  // namespace

char* zxLogicalExport::reverse_in_front(char* start,
                                        std::string_view run) const {
  for (std::size_t i = 0; i < run.size();) {
    const bool is_plain = !is<Letters::ansi>(run[i], k_care_at_start);
    const std::size_t end = is_plain ? i : number_end(run, i);
    if (end == i) {
      start = put_in_front(start, k_mirror[run[i++]]);
    } else {
      start = put_in_front(start, run.substr(i, end - i));
      i = end;
    }
  }
  return start;
}

char* zxLogicalExport::line_in_front(char* start, std::string_view line) const {
  while (!line.empty()) {
    const Run run = split_physical_run<Letters::ansi_and_dos>(line, true);
    if (!ZX_ASSERT(run.length > 0)) break;
    const std::string_view piece = line.substr(0, run.length);
    start =
        run.rtl ? reverse_in_front(start, piece) : put_in_front(start, piece);
    line.remove_prefix(run.length);
  }
  return start;
}

std::string_view zxLogicalExport::convert(char* room,
                                          std::string_view physical) const {
  char* const end = room + room_for(physical.size());
  char* start = end;
  constexpr std::string_view k_line_end = "\r\n";
  if (physical.find('\r') != std::string_view::npos) {
    for (std::size_t at = physical.rfind(k_line_end);
         at != std::string_view::npos; at = physical.rfind(k_line_end)) {
      start = line_in_front(start, physical.substr(at + k_line_end.size()));
      start = put_in_front(start, k_line_end);
      physical = physical.substr(0, at);
    }
  }
  start = line_in_front(start, physical);
  return {start, static_cast<std::size_t>(end - start)};
}
