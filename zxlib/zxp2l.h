// zxp2l.h - Hebrew reordering, between physical text (display order, code
// page 862 or 1255) and logical text (reading order, code page 1255), and
// from both to Unicode.
//
// Hebrew that was laid out for a character screen stands reversed in memory;
// numbers, dates, amounts and Latin words in it do not.  A line is cut into
// runs of one direction; right-to-left runs are reversed, numbers inside
// them keep their order and brackets are exchanged for their partners.
//
// Bytes 253 and 254 are the marks of left-to-right and right-to-left: read
// as strong characters, written where a number would otherwise join the
// wrong run.  `rtl` is the base direction of the text, true for right to
// left.
//
// Base right to left, Hebrew shown as capitals:
//   physical  ".DCBA abc (12.5%) FE"    logical  "EF (12.5%) abc ABCD."
//
// On Windows 95 a percent sign is no part of the number ahead of it, so "50%"
// changes its order there; which system it is, is asked once per process.
//
// A run against the base direction without a letter of its own fails an
// assertion (a mark 253 that no Latin letter follows, or 254 likewise); the
// text so far comes back if that is dropped.
#ifndef ZXP2L_H
#define ZXP2L_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "zxstr.h"

// One line of physical text as logical text, and the reverse (which gives
// code page 862 and drops the marks).
zxStr logical_from_phys(const zxStr& text, bool rtl);
zxStr phys_from_logical(const zxStr& text, bool rtl);

// The same for text of several lines, each treated alone; lines are split
// and joined at CR LF.
zxStr logical_from_phys_lines(const zxStr& text, bool rtl);
zxStr phys_from_logical_lines(const zxStr& text, bool rtl);

// Hebrew letters from code page 862 to 1255 in place, and back; no other
// byte changes.
void dos_to_ansi(zxStr& text);
void ansi_to_dos(zxStr& text);

// Text of code page 862 or 1255 as Unicode, in units of 16 bits of which the
// low byte comes first.  A byte below 128 is the unit of that value, and any
// other that which stands as far from alef as the byte from alef's; units
// behind tav are dropped, the marks among them.
zxStr dos_to_utf16(const zxStr& text);
zxStr ansi_to_utf16(const zxStr& text);

// Text of code page 1255 in UTF-8.  Bytes above the last Hebrew letter, the
// marks among them, are dropped; those from 128 to 223 come out as the code
// points as far below alef as they stand below its byte.
zxStr ansi_to_utf8(const zxStr& text);

namespace zxp2l_detail {

// The code point that stands as far from alef as a byte of 128 and more from
// alef's byte; -1 behind tav.
constexpr int code_of(int byte, int alef_byte) {
  constexpr int k_alef = 0x5D0;
  constexpr int k_tav = 0x5EA;
  const int code = byte < 128 ? byte : byte - alef_byte + k_alef;
  return code > k_tav ? -1 : code;
}
constexpr int dos_code(int byte) { return code_of(byte, 128); }
constexpr int ansi_code(int byte) { return code_of(byte, 224); }

// What a byte of text becomes: up to two bytes, of which both can be stored
// and only the first `size` be kept.
struct Unit {
  char bytes[2];
  std::uint8_t size;
};

// A code point up to tav in UTF-8; nothing for -1.  Those from 128 bytes below
// alef on all take two bytes.
constexpr Unit utf8_unit(int code) {
  if (code < 0) return {{}, 0};
  if (code < 128) return {{static_cast<char>(code), '\0'}, 1};
  return {{static_cast<char>(0xC0 | code >> 6),
           static_cast<char>(0x80 | (code & 0x3F))},
          2};
}

}  // namespace zxp2l_detail

// The road of exports, from stored fields to UTF-8 in one pass: what
//   ansi_to_utf8(logical_from_phys_lines(text, true))
// gives, less the ASCII bytes that the target file has no room for.
//
//   static constexpr zxLogicalExport cells("\",");
//   std::string_view text = cells.convert(room, field);
class zxLogicalExport {
 public:
  // An object that drops the given ASCII bytes from its results; all else
  // happens as if they stayed to the end.
  constexpr explicit zxLogicalExport(std::string_view dropped);

  // Room for the result of a text of n bytes.
  static constexpr std::size_t room_for(std::size_t n) { return 2 * n + 2; }

  // Converts a text into `room`, of room_for(its length) bytes; the result
  // lies somewhere in it.  A mark without its letter fails an assertion, as
  // it does in logical_from_phys().
  std::string_view convert(char* room, std::string_view physical) const;

 private:
  // The UTF-8 of a byte of logical text, its last byte at the end of `bytes`,
  // so that both can be stored ahead of the result.
  using Unit = zxp2l_detail::Unit;
  using Units = std::array<Unit, 256>;

  static constexpr int to_ansi(int byte) {
    return byte >= 128 && byte <= 154 ? byte + 96 : byte;
  }
  static constexpr Unit unit_of(int ansi_byte);
  char* put_in_front(char* start, char byte) const;
  char* put_in_front(char* start, std::string_view piece) const;
  char* reverse_in_front(char* start, std::string_view run) const;
  char* line_in_front(char* start, std::string_view line) const;

  Units units{};
};

constexpr zxLogicalExport::Unit zxLogicalExport::unit_of(int byte) {
  Unit unit = zxp2l_detail::utf8_unit(zxp2l_detail::ansi_code(byte));
  if (unit.size == 1) unit.bytes[1] = unit.bytes[0];
  return unit;
}

constexpr zxLogicalExport::zxLogicalExport(std::string_view dropped) {
  for (int byte = 0; byte < 256; ++byte)
    units[static_cast<std::size_t>(byte)] = unit_of(to_ansi(byte));
  for (const char byte : dropped)
    units[static_cast<unsigned char>(byte)].size = 0;
}

#endif  // ZXP2L_H
