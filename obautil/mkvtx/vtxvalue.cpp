// vtxvalue.cpp - the values of a table's text.
// Tests: tests/obautil/vtxvalue_test.cpp.
#include "vtxvalue.h"

#include <charconv>
#include <cmath>

#include "zxp2l.h"
#include "zxsfmt.h"

namespace {

bool fail(zxStr& wrong, const zxStr& text) {
  wrong = text;
  return false;
}

// ---- UTF-8

// The bits that a continuation byte carries.
constexpr unsigned k_payload = 0x3F;
constexpr unsigned k_payload_bits = 6;

constexpr char32_t k_least_by_length[] = {0, 0, 0x80, 0x800, 0x10000};

bool is_continuation(char byte) {
  return (static_cast<unsigned char>(byte) & ~k_payload) == 0x80;
}

// The bytes of the character that starts with `lead`; 0 for none.
std::size_t utf8_length(unsigned lead) {
  if (lead < 0x80) return 1;
  if (lead < 0xC0) return 0;
  if (lead < 0xE0) return 2;
  if (lead < 0xF0) return 3;
  return lead < 0xF8 ? 4 : 0;
}

bool is_scalar(char32_t c) {
  return c <= 0x10FFFF && (c < 0xD800 || c > 0xDFFF);
}

// Takes one character off the front of a text that is not empty; false if
// there is none.
bool take_character(std::string_view& text, char32_t& character) {
  const auto lead = static_cast<unsigned char>(text[0]);
  const std::size_t length = utf8_length(lead);
  if (length == 0 || length > text.size()) return false;
  char32_t c = length == 1 ? lead : lead & (0x7FU >> length);
  for (std::size_t i = 1; i < length; ++i) {
    if (!is_continuation(text[i])) return false;
    c = c << k_payload_bits | (static_cast<unsigned char>(text[i]) & k_payload);
  }
  if (c < k_least_by_length[length] || !is_scalar(c)) return false;
  text.remove_prefix(length);
  character = c;
  return true;
}

// ---- plain numbers

// The digits at the front of a text.
std::string_view take_digits(std::string_view& text) {
  std::size_t n = 0;
  while (n < text.size() && zx_is_digit(text[n])) ++n;
  const std::string_view digits = text.substr(0, n);
  text.remove_prefix(n);
  return digits;
}

bool take_sign(std::string_view& text) {
  const bool negative = text.starts_with('-');
  if (negative || text.starts_with('+')) text.remove_prefix(1);
  return negative;
}

// A number taken apart: [ sign ] digits [ "." digits ].
struct PlainNumber {
  bool negative = false;
  std::string_view whole;
  std::string_view fraction;
};

bool take_apart(std::string_view text, PlainNumber& number) {
  number.negative = take_sign(text);
  number.whole = take_digits(text);
  if (number.whole.empty()) return false;
  if (text.empty()) return true;
  if (text[0] != '.') return false;
  text.remove_prefix(1);
  number.fraction = take_digits(text);
  return !number.fraction.empty() && text.empty();
}

// Adds digits behind those of `units`; false when they are more than any
// form holds.
bool add_digits(std::string_view digits, std::int64_t& units) {
  constexpr std::int64_t k_limit = 1000000000000;
  for (const char digit : digits) {
    units = units * 10 + (digit - '0');
    if (units >= k_limit) return false;
  }
  return true;
}

// The number in units of 10 ** -places; false if it is too large or has
// other digits behind them.
bool in_units(const PlainNumber& number, std::size_t places,
              std::int64_t& units) {
  constexpr std::string_view k_zeros = "00000000";
  const std::string_view fraction = number.fraction;
  const std::string_view kept = fraction.substr(0, places);
  units = 0;
  if (!add_digits(number.whole, units) || !add_digits(kept, units) ||
      !add_digits(k_zeros.substr(0, places - kept.size()), units))
    return false;
  if (number.negative) units = -units;
  return fraction.find_first_not_of('0', kept.size()) == std::string_view::npos;
}

// A run of digits as a number; false if it is none, or far too large.
bool digits_value(std::string_view text, std::int64_t& value) {
  const std::string_view digits = take_digits(text);
  value = 0;
  return !digits.empty() && text.empty() && add_digits(digits, value);
}

// ---- the forms of a decimal

// A form that a number can ask for by name.
struct Form {
  std::string_view name;
  std::size_t places;      // digits behind the point
  std::int64_t unit;       // what one unit is worth, in those places
  unsigned shift;          // of the units in the word
  std::uint32_t low_bits;  // the form's mark
};
constexpr Form k_forms[] = {
    {"integer", 0, 1, 1, 0},
    {"hundredths", 2, 1, 2, 3},
    {"ten-thousandths", 4, 1, 4, 1},
    {"millionths", 6, 1, 4, 5},
    {"hundred-millionths", 8, 1, 4, 9},
    {"thousands", 0, 1000, 4, 13},
};

const Form* find_form(std::string_view name) {
  for (const Form& form : k_forms)
    if (form.name == name) return &form;
  return nullptr;
}

// True if the form's units lie within its bits.  Whole numbers of hundredths
// would be read as sixty-fourths.
bool holds(const Form& form, std::int64_t units) {
  const std::int64_t limit = std::int64_t{1} << (31 - form.shift);
  const bool is_hundredths = form.shift == 2;
  return units >= -limit && units < limit &&
         !(is_hundredths && units % 100 == 0);
}

HvlDecimal word_of(const Form& form, std::int64_t units) {
  const auto word = static_cast<std::uint32_t>(units) << form.shift;
  return HvlDecimal::from_word(static_cast<std::int32_t>(word | form.low_bits));
}

bool fail_number(std::string_view text, zxStr& wrong) {
  return fail(wrong, quoted_word(text) + " is no number");
}

bool fail_form(std::string_view text, std::string_view form, zxStr& wrong) {
  return fail(wrong, quoted_word(text) + " can't be stored as " + zxStr(form));
}

bool formed_number(std::string_view text, const Form& form, HvlDecimal& number,
                   zxStr& wrong) {
  PlainNumber plain;
  if (!take_apart(text, plain)) return fail_number(text, wrong);
  std::int64_t units = 0;
  if (!in_units(plain, form.places, units) || units % form.unit != 0 ||
      !holds(form, units / form.unit))
    return fail_form(text, form.name, wrong);
  number = word_of(form, units / form.unit);
  return true;
}

bool small_number(std::string_view text, HvlDecimal& number, zxStr& wrong) {
  constexpr std::int64_t k_largest = 9999;
  std::int64_t value = 0;
  if (!whole_value(text, -k_largest, k_largest, value, wrong)) return false;
  number.set_small_int(static_cast<std::int32_t>(value));
  return true;
}

// [ sign ] [ digits blank ] digits "/64"
bool sixty_fourths_number(std::string_view text, HvlDecimal& number,
                          zxStr& wrong) {
  constexpr std::string_view k_ending = "/64";
  constexpr std::int64_t k_whole_limit = 80000;
  std::string_view rest = text;
  const bool negative = take_sign(rest);
  if (!rest.ends_with(k_ending)) return fail_number(text, wrong);
  rest.remove_suffix(k_ending.size());
  if (rest != zx_trimmed(rest)) return fail_number(text, wrong);
  const std::string_view head = take_word(rest);
  std::int64_t whole = 0;
  std::int64_t parts = 0;
  const bool is_good =
      rest.empty() ? digits_value(head, parts)
                   : digits_value(head, whole) && digits_value(rest, parts);
  if (!is_good) return fail_number(text, wrong);
  if (whole >= k_whole_limit || parts >= 64)
    return fail_form(text, "sixty-fourths", wrong);
  const std::int32_t sign = negative ? -1 : 1;
  number.set_sixty_fourths(sign * static_cast<std::int32_t>(whole),
                           sign * static_cast<std::int32_t>(parts));
  return true;
}

bool raw_number(std::string_view text, HvlDecimal& number, zxStr& wrong) {
  constexpr std::size_t k_prefix = 2;  // "0x"
  constexpr int k_hexadecimal = 16;
  std::uint32_t word = 0;
  const char* const end = text.data() + text.size();
  const auto read =
      std::from_chars(text.data() + k_prefix, end, word, k_hexadecimal);
  if (read.ec != std::errc() || read.ptr != end)
    return fail(wrong, quoted_word(text) + " is no word of 32 bits");
  number = HvlDecimal::from_word(static_cast<std::int32_t>(word));
  return true;
}

bool plain_number(std::string_view text, HvlDecimal& number, zxStr& wrong) {
  constexpr double k_limit = 100000000000;
  PlainNumber plain;
  if (!take_apart(text, plain)) return fail_number(text, wrong);
  std::string_view digits = text;
  take_sign(digits);
  double value = 0;
  const auto read =
      std::from_chars(digits.data(), digits.data() + digits.size(), value);
  // Too many digits behind the point are no overflow.
  const bool is_small =
      read.ec == std::errc()
          ? value < k_limit
          : plain.whole.find_first_not_of('0') == std::string_view::npos;
  if (!is_small)
    return fail(wrong, quoted_word(text) + " is out of range: the limit is " +
                           "100000000000");
  number.set_double(plain.negative ? -value : value);
  return true;
}

// ---- texts

zxStr character_name(char32_t character) {
  char digits[8];
  const auto end = std::to_chars(digits, digits + sizeof digits,
                                 static_cast<std::uint32_t>(character), 16)
                       .ptr;
  zxStr hex(digits, static_cast<std::int32_t>(end - digits));
  hex.to_upper();
  zxStr name = "U+";
  for (std::int32_t i = hex.length(); i < 4; ++i) name.append('0');
  return name.append(hex);
}

// The byte of code page 1255; NUL for a character that can't be stored.
char byte_of(char32_t character) {
  constexpr char32_t k_alef = 0x5D0;
  constexpr char32_t k_tav = 0x5EA;
  constexpr char32_t k_alef_byte = 224;
  constexpr char32_t k_ltr_mark = 0x200E;
  constexpr char32_t k_rtl_mark = 0x200F;
  if (character == '\t' || (character >= ' ' && character < 127))
    return static_cast<char>(character);
  if (character >= k_alef && character <= k_tav)
    return static_cast<char>(character - k_alef + k_alef_byte);
  if (character == k_ltr_mark) return static_cast<char>(253);
  return character == k_rtl_mark ? static_cast<char>(254) : '\0';
}

// A UTF-8 text in code page 1255.
bool to_ansi(std::string_view text, zxStr& ansi, zxStr& wrong) {
  ansi.reserve(zx_count(text.size()));
  while (!text.empty()) {
    char32_t character = 0;
    if (!take_character(text, character))
      return fail(wrong, "the text is not UTF-8");
    const char byte = byte_of(character);
    if (byte == '\0')
      return fail(wrong, "the character " + character_name(character) +
                             " can't be stored");
    ansi.append(byte);
  }
  return true;
}

std::string_view without_quotes(std::string_view text) {
  const bool has_quotes =
      text.size() >= 2 && text.front() == '"' && text.back() == '"';
  return has_quotes ? text.substr(1, text.size() - 2) : text;
}

}  // namespace

// ---- words

zxStr quoted_word(std::string_view text) {
  constexpr std::size_t k_most = 24;
  std::size_t size = text.size();
  if (size > k_most) {
    size = k_most;
    while (size > 0 && is_continuation(text[size])) --size;
  }
  zxStr word("'");
  for (const char byte : text.substr(0, size))
    word.append(zx_is(byte, k_class_control) ? '?' : byte);
  return word.append(size < text.size() ? "...'" : "'");
}

std::string_view take_word(std::string_view& text) {
  std::size_t n = 0;
  while (n < text.size() && !zx_is_space(text[n])) ++n;
  const std::string_view word = text.substr(0, n);
  text = zx_trimmed(text.substr(n));
  return word;
}

bool is_utf8(std::string_view text) {
  char32_t character = 0;
  while (!text.empty())
    if (!take_character(text, character)) return false;
  return true;
}

// ---- values

bool code_page_value(std::string_view text, VtxCodePage& page, zxStr& wrong) {
  if (text != "862" && text != "1255")
    return fail(wrong, quoted_word(text) + " is no code page: 862 or 1255");
  page = text == "862" ? VtxCodePage::dos : VtxCodePage::windows;
  return true;
}

bool whole_value(std::string_view text, std::int64_t low, std::int64_t high,
                 std::int64_t& value, zxStr& wrong) {
  std::string_view rest = text;
  const bool negative = take_sign(rest);
  std::int64_t size = 0;
  const bool is_good = digits_value(rest, size);
  if (negative) size = -size;
  if (!is_good || size < low || size > high)
    return fail(wrong,
                sfmt("# is no whole number from # to #", quoted_word(text),
                     static_cast<double>(low), static_cast<double>(high)));
  value = size;
  return true;
}

bool number_value(std::string_view text, HvlDecimal& number, zxStr& wrong) {
  std::string_view rest = text;
  const std::string_view word = take_word(rest);
  if (const Form* form = find_form(word))
    return formed_number(rest, *form, number, wrong);
  if (word == "small") return small_number(rest, number, wrong);
  if (text.starts_with("0x")) return raw_number(text, number, wrong);
  if (text.find('/') != std::string_view::npos)
    return sixty_fourths_number(text, number, wrong);
  return plain_number(text, number, wrong);
}

namespace {

// Two or four digits at a place of a date.
std::int32_t date_part(std::string_view text, std::size_t at,
                       std::size_t size) {
  std::int64_t value = 0;
  digits_value(text.substr(at, size), value);
  return static_cast<std::int32_t>(value);
}

bool has_date_shape(std::string_view text) {
  constexpr std::string_view k_shape = "dddd-dd-dd";
  if (text.size() != k_shape.size()) return false;
  for (std::size_t i = 0; i < text.size(); ++i)
    if (k_shape[i] == 'd' ? !zx_is_digit(text[i]) : text[i] != '-')
      return false;
  return true;
}

// Year, month and day as one number that grows with the date.
std::int32_t date_rank(std::int32_t year, std::int32_t month,
                       std::int32_t day) {
  return (year * 100 + month) * 100 + day;
}

std::int32_t rank_of(zxDate date) {
  std::int32_t year = 0;
  std::int32_t month = 0;
  std::int32_t day = 0;
  date.get_full(year, month, day);
  return date_rank(year, month, day);
}

// The first date whose rank is not below the given one.  A date that the
// calendar does not have is told by this one having another rank.
zxDate first_date_from(std::int32_t rank) {
  constexpr std::int16_t k_last_day = 32141;  // 2057-12-31
  std::int16_t low = 0;
  std::int16_t high = k_last_day;
  while (low < high) {
    const auto middle = static_cast<std::int16_t>((low + high) / 2);
    if (rank_of(zxDate::from_stored(middle)) < rank)
      low = static_cast<std::int16_t>(middle + 1);
    else
      high = middle;
  }
  return zxDate::from_stored(low);
}

}  // namespace

bool date_value(std::string_view text, zxDate& date, zxStr& wrong) {
  if (has_date_shape(text)) {
    const std::int32_t rank = date_rank(
        date_part(text, 0, 4), date_part(text, 5, 2), date_part(text, 8, 2));
    const zxDate found = first_date_from(rank);
    if (rank_of(found) == rank) {
      date = found;
      return true;
    }
  }
  return fail(wrong,
              quoted_word(text) + " is no date from 1970-01-01 to 2057-12-31");
}

bool text_value(std::string_view text, VtxCodePage page, std::int32_t room,
                zxStr& stored, zxStr& wrong) {
  zxStr ansi;
  if (!to_ansi(without_quotes(text), ansi, wrong)) return false;
  zxStr bytes = phys_from_logical(ansi, true);
  if (bytes.length() > room)
    return fail(wrong, sfmt("the text has # characters, # can be stored",
                            bytes.length(), room));
  if (page == VtxCodePage::windows) dos_to_ansi(bytes);
  stored = bytes;
  return true;
}
