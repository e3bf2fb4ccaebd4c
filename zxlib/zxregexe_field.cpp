// The typed fields.  From the bottom up: a reader that never goes beyond the
// width or the subject, numbers, reals, tokens, quoted texts, dates.

#include <algorithm>
#include <cstdint>

#include "zxregexe_impl.h"

namespace zxregexe {

namespace {

// The bytes that a field may take.
class Reader {
 public:
  Reader(zxnode::Node node, const char* subject_at, const char* subject_end)
      : at(subject_at),
        start(subject_at),
        end(subject_end),
        width(static_cast<std::int8_t>(zxnode::operand(node)[1])),
        flags(zxnode::operand(node)[3]) {
    if (has_width())
      end = std::min(end, start + std::min<std::ptrdiff_t>(width, end - start));
  }

  bool has_width() const { return width != k_field_not_given; }
  bool has(unsigned flag) const { return (flags & flag) != 0; }
  bool has_more() const { return at < end; }
  bool sees(char byte) const { return at < end && *at == byte; }
  bool sees_one_of(char a, char b) const { return sees(a) || sees(b); }
  bool sees_class(unsigned bits) const { return at < end && zx_is(*at, bits); }
  bool is_used_up() const { return has_width() && at - start == width; }

  // Blanks ahead of the field, unless the flag forbids them.
  void skip_blanks() {
    if (has(k_field_zero)) return;
    while (sees(' ')) ++at;
  }

  // The end of a field that has been read; null if it does not fill its
  // width.
  const char* finished() const {
    return !has_width() || is_used_up() ? at : nullptr;
  }
  const char* finished_if(bool ok) const { return ok ? finished() : nullptr; }

  const char* at;
  const char* start;
  const char* end;  // of the subject or of the width, whichever is first
  const int width;
  const unsigned flags;
};

// --------------------------------------------------------------- numbers --

struct Sign {
  bool is_allowed;
  bool is_there;
};

// A sign; it may not fill the width.
Sign read_sign(Reader& in) {
  Sign sign{true, in.sees_one_of('-', '+')};
  if (sign.is_there) {
    ++in.at;
    if (in.is_used_up() || in.has(k_field_equals)) sign.is_allowed = false;
  } else if (in.has(k_field_plus)) {
    sign.is_allowed = false;
  }
  return sign;
}

// 0x, if a byte stands behind it.
bool takes_hex_prefix(Reader& in) {
  if (in.end - in.at < 3 || in.at[0] != '0') return false;
  if (in.at[1] != 'x' && in.at[1] != 'X') return false;
  in.at += 2;
  return true;
}

int digit_value(char byte, int base) {
  if (zx_is_digit(byte)) return byte - '0';
  const char low = zx_lower(byte);
  return base == 16 && low >= 'a' && low <= 'f' ? low - 'a' + 10 : -1;
}

// Digits; false if their value, whatever its sign, does not fit 32 bits: all of
// them under "=", those of a positive number otherwise.
bool read_digits(Reader& in, int base) {
  std::uint64_t value = 0;
  for (; in.has_more(); ++in.at) {
    const int digit = digit_value(*in.at, base);
    if (digit < 0) break;
    value = value * static_cast<unsigned>(base) + static_cast<unsigned>(digit);
    if (value > 0xFFFFFFFFU) return false;
  }
  return in.has(k_field_equals) || value <= 0x7FFFFFFFU;
}

const char* integer_end(Reader& in, int base) {
  in.skip_blanks();
  if (in.is_used_up()) return in.has(k_field_blank) ? in.at : nullptr;
  const Sign sign = read_sign(in);
  if (!sign.is_allowed) return nullptr;
  const bool has_prefix = base == 16 && takes_hex_prefix(in);
  const char* digits = in.at;
  if (!read_digits(in, base)) return nullptr;
  if (in.at == digits)
    return in.finished_if(in.has(k_field_blank) && !sign.is_there &&
                          !has_prefix);
  if (base == 16 && !has_prefix && in.sees_one_of('h', 'H')) ++in.at;
  return in.finished();
}

const char* real_end(Reader& in, bool has_suffix) {
  in.skip_blanks();
  if (in.is_used_up()) return in.has(k_field_blank) ? in.at : nullptr;
  const Sign sign = read_sign(in);
  if (!sign.is_allowed) return nullptr;
  bool has_digits = false;
  bool has_point = false;
  for (; in.has_more(); ++in.at) {
    if (zx_is_digit(*in.at))
      has_digits = true;
    else if (*in.at == '.' && !has_point)
      has_point = true;
    else
      break;
  }
  if (has_suffix && in.sees_one_of('k', 'm')) ++in.at;
  return in.finished_if(
      has_digits || (in.has(k_field_blank) && !sign.is_there && !has_point));
}

// ----------------------------------------------------------------- texts --

const char* token_end(Reader& in) {
  if (!in.has_width()) {
    while (in.has_more() && !zx_is_space(*in.at)) ++in.at;
    return in.at > in.start || in.has(k_field_blank) ? in.at : nullptr;
  }
  if (in.end - in.start < in.width) return nullptr;
  const bool is_blank =
      std::all_of(in.start, in.end, [](char byte) { return byte == ' '; });
  return is_blank && !in.has(k_field_blank) ? nullptr : in.end;
}

const char* quoted_end(Reader& in) {
  in.skip_blanks();
  const bool opens =
      in.sees('"') || (in.has(k_field_plus) && in.sees_one_of('~', '\''));
  if (!opens) return nullptr;
  const char quote = *in.at++;
  while (in.has_more() && *in.at != quote) {
    if (*in.at == '\\') ++in.at;
    if (in.has_more()) ++in.at;
  }
  if (!in.has_more()) return nullptr;
  ++in.at;
  return in.finished();
}

// ----------------------------------------------------------------- dates --

// A number of one to `most` digits; -1 if there is none, or more.
int read_part(Reader& in, int most) {
  int value = 0;
  const char* start = in.at;
  for (; in.sees_class(k_class_digit); ++in.at) {
    if (in.at - start == most) return -1;
    value = value * 10 + (*in.at - '0');
  }
  return in.at == start ? -1 : value;
}

bool takes_separator(Reader& in, char separator) {
  if (!in.sees(separator)) return false;
  ++in.at;
  return true;
}

// Years of two digits are taken for 1970 to 2057.
bool is_year(int year) {
  return (year >= 0 && year <= 57) || (year >= 70 && year <= 100) ||
         (year >= 1970 && year <= 2057);
}

bool is_day(int day, int month, int year) {
  if (day < 1 || day > 31 || month < 1 || month > 12) return false;
  if (month == 2) return day <= (year % 4 == 0 ? 29 : 28);
  const bool is_short = month == 4 || month == 6 || month == 9 || month == 11;
  return day <= (is_short ? 30 : 31);
}

const char* date_end(Reader& in) {
  const int day = read_part(in, 2);
  if (day < 0 || !in.has_more()) return nullptr;
  const char separator = *in.at;
  if (separator != '/' && separator != '.' && separator != '-') return nullptr;
  ++in.at;
  const int month = read_part(in, 2);
  if (month < 0 || !takes_separator(in, separator)) return nullptr;
  const int year = read_part(in, 4);
  return is_year(year) && is_day(day, month, year) ? in.at : nullptr;
}

}  // namespace

const char* field_end(zxnode::Node node, const char* at, const char* end) {
  Reader in(node, at, end);
  switch (zxnode::operand(node)[4]) {
    case 'd':
      return integer_end(in, 10);
    case 'x':
      return integer_end(in, 16);
    case 'f':
      return real_end(in, false);
    case 'v':
      return real_end(in, true);
    case 's':
      return token_end(in);
    case 't':
      in.end = end;  // a date has no use for the width
      return date_end(in);
    default:
      return quoted_end(in);
  }
}

}  // namespace zxregexe
