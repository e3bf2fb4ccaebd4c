// vtxvalue.h - the values of a table's text: whole numbers, decimals, dates
// and Hebrew texts, from how a person writes them to how a record stores
// them.  docs/mkvtx.md has the notations.
//
// Each operation gives true and stores the value, or gives false, leaves the
// value alone and says in `wrong` what is wrong, in words that follow
// "file(line): ".
#ifndef VTXVALUE_H
#define VTXVALUE_H

#include <cstdint>
#include <string_view>

#include "hvldec.h"
#include "zxdate.h"
#include "zxstr.h"

// Where the Hebrew letters lie among the bytes.
enum class VtxCodePage : std::uint8_t {
  dos,      // 128 to 154, as in code page 862
  windows,  // 224 to 250, as in code page 1255
};

// "862" or "1255".
bool code_page_value(std::string_view text, VtxCodePage& page, zxStr& wrong);

// A whole number from `low` to `high`, with a sign or without.
bool whole_value(std::string_view text, std::int64_t low, std::int64_t high,
                 std::int64_t& value, zxStr& wrong);

// A decimal: "12.5" in the form that HvlDecimal::set_double() chooses,
// "12 3/64", "millionths 0.5" and the like in the form that is named, "small
// 7" by set_small_int(), "0x193" as that word.
bool number_value(std::string_view text, HvlDecimal& number, zxStr& wrong);

// "2026-11-21", from 1970 to 2057.
bool date_value(std::string_view text, zxDate& date, zxStr& wrong);

// A UTF-8 text in reading order, which may stand in double quotes, as the
// bytes of a field: in display order from right to left, at most `room` of
// them.  The text may hold ASCII without control characters but the tab, the
// 27 letters from alef to tav, and the marks U+200E and U+200F, which have
// their say in the order and are not stored.
bool text_value(std::string_view text, VtxCodePage page, std::int32_t room,
                zxStr& stored, zxStr& wrong);

// True if the bytes are UTF-8, without surrogates and overlong forms.
bool is_utf8(std::string_view text);

// The text in single quotes for a message: a long one is cut, control
// characters show as "?".
zxStr quoted_word(std::string_view text);

// Takes the first word off a trimmed text, which stays trimmed.
std::string_view take_word(std::string_view& text);

#endif  // VTXVALUE_H
