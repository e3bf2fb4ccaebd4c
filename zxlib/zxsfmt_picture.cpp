// zxsfmt_picture.cpp - number pictures: "%v" and its bracket.
// Tests: tests/zxlib/zxsfmt_picture_test.cpp.
//
// A picture is a set of flags.  The number is written with its decimals; if
// that is longer than the room that the width leaves, decimals are cut, then
// separators are left out, then the number is scaled down by a thousand and
// gets a suffix, up to twice.
#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <optional>

#include "zxsfmt_impl.h"

namespace zxsfmt_detail {
namespace {

// By thousands.
constexpr char k_suffixes[] = {'\0', 'k', 'm', 'b', 'r'};

constexpr int k_last_level = 2;
constexpr std::int32_t k_width_limit = 40;

zxPrecisionTable g_precisions = {0, 500.0, 100.0, 0, 5.0, 0, 0};

// ---- the picture

class Flags {
 public:
  bool has(char letter) const { return (bits & bit(letter)) != 0; }
  void set(char letter) { bits |= bit(letter); }
  void clear(char letter) { bits &= ~bit(letter); }

 private:
  static std::uint32_t bit(char letter) { return 1U << (letter - 'a'); }

  std::uint32_t bits = 0;
};

// The flag that a character of a picture sets; NUL for none.
char flag_of(char byte) {
  switch (byte) {
    case '+':
      return 's';
    case ',':
      return 'c';
    case '0':
      return 'z';
    case 'K':
      return 't';
    case '~':
      return 'e';
    default:
      return zx_is(byte, k_class_lower) ? byte : '\0';
  }
}

bool read_flags(std::string_view picture, Flags& flags) {
  for (const char byte : picture) {
    if (byte == ' ') continue;
    const char flag = flag_of(byte);
    if (!ZX_ASSERT(flag != '\0')) return false;
    flags.set(flag);
  }
  return true;
}

// The number of an argument.  None is the sentinel, so that a double of that
// value counts as none too.
std::optional<double> number_of(const zxFmtArg& arg) {
  constexpr double k_none = -1e30;
  double number = k_none;
  switch (arg.tag) {
    case 'i':
    case 'l':
    case 'c':
      number = arg.number;
      break;
    case 'u':
    case 'v':
    case 'b':
      number = arg.word();
      break;
    case 'f':
      number = arg.real;
      break;
    default:
      break;
  }
  if (number == k_none) return {};
  return number;
}

// The number of decimals that a value gets by itself.
std::int32_t automatic_precision(double value) {
  if (value == 0) return 0;
  for (std::size_t decimals = g_precisions.size() - 1; decimals > 0; --decimals)
    if (g_precisions[decimals] != 0 && g_precisions[decimals] >= value)
      return static_cast<std::int32_t>(decimals);
  return 0;
}

// ---- the text of a number

// A text in a room that is large enough for all that is done to it.
class Text {
 public:
  explicit Text(char* room) : bytes(room) {}

  std::int32_t length() const { return size; }
  std::string_view view() const { return {bytes, zx_size(size)}; }
  char last() const { return bytes[size - 1]; }

  void set_number(double value, std::int32_t precision) {
    char* end = bytes;
    if (std::signbit(value)) *end++ = '-';
    if (std::isinf(value)) {
      std::memcpy(end, "inf", 3);
      end += 3;
    } else {
      end = write_fixed(end, std::fabs(value), precision);
    }
    size = static_cast<std::int32_t>(end - bytes);
  }
  void cut(std::int32_t n) { size = n; }
  void add(char byte) { bytes[size++] = byte; }
  void insert(std::int32_t at, char byte, std::int32_t n = 1) {
    std::memmove(bytes + at + n, bytes + at, zx_size(size - at));
    std::memset(bytes + at, byte, zx_size(n));
    size += n;
  }

  // The place of the point; the length without one.
  std::int32_t integer_length() const {
    const std::size_t point = view().find('.');
    return point == std::string_view::npos ? size
                                           : static_cast<std::int32_t>(point);
  }
  bool has_point() const { return integer_length() < size; }

 private:
  char* bytes;
  std::int32_t size = 0;
};

class Picture {
 public:
  Picture(Flags picture_flags, double number, Measures measures);

  // Up to how many bytes the text takes.
  std::size_t text_room() const;

  // Writes the number; `measures` has a width below the limit.
  void write(Text& text);

 private:
  void attempt(Text& text);
  void strip_zeros(Text& text) const;
  bool replace_zeros(Text& text) const;
  std::int32_t commas_wanted(const Text& text) const;
  bool cut_decimals(Text& text, std::int64_t& spare) const;
  void insert_commas(Text& text, std::int64_t count) const;
  void scale();
  void add_signs(Text& text) const;

  // A letter behind the digits of the integer part stays outside of them.
  static bool has_letter(const Text& text) {
    return zx_is(text.view()[zx_size(text.integer_length() - 1)],
                 k_class_lower);
  }
  char suffix(int thousands) const {
    return k_suffixes[level + (flags.has('t') ? 1 : 0) + thousands];
  }

  Flags flags;
  double value;
  bool is_negative;
  std::int32_t width;
  std::int32_t precision;
  std::int64_t room;
  int level = 0;
};

Picture::Picture(Flags picture_flags, double number, Measures measures)
    : flags(picture_flags),
      value(number < 0 ? -number : number),
      is_negative(number < 0 && !picture_flags.has('a')),
      width(measures.width),
      precision(measures.precision),
      room(width >= 0 ? width : INT32_MAX) {
  if (is_negative || flags.has('s')) --room;
  if (is_negative && flags.has('f')) --room;
  if (flags.has('p')) {
    --room;
    value *= 100;
  }
  if (flags.has('d')) --room;
  if (precision < 0) precision = automatic_precision(value);
}

std::size_t Picture::text_room() const {
  constexpr std::size_t k_marks = 8;  // of all kinds, but for commas
  const std::size_t number = fixed_room(value, precision);
  const std::size_t commas = (number - zx_size(precision)) / 3;
  return number + commas + k_marks + k_width_limit;
}

void Picture::write(Text& text) {
  attempt(text);
  while (text.length() > room && level < k_last_level) {
    scale();
    attempt(text);
  }
  if (text.length() > room) {
    text.cut(0);
    while (text.length() < room) text.add('*');
  }
  add_signs(text);
  if (text.length() < width) text.insert(0, ' ', width - text.length());
}

// The next level: whole thousands.
void Picture::scale() {
  precision = 0;
  flags.clear('k');
  if (flags.has('m')) flags.set('k');
  flags.clear('m');
  value *= 0.001;
  ++level;
}

// Writes the number at the present level.
void Picture::attempt(Text& text) {
  text.set_number(value, precision);
  if (flags.has('z') || flags.has('i')) strip_zeros(text);
  const bool is_pending = !replace_zeros(text) && level > 0;
  const std::int64_t wanted = commas_wanted(text);
  std::int64_t spare = room - text.length() - wanted - (is_pending ? 1 : 0);
  const bool is_cut = spare < 0 && cut_decimals(text, spare);
  std::int64_t commas = std::min(wanted, spare + wanted);
  if (level > 0 && !is_cut) --commas;
  insert_commas(text, commas);
  if (is_pending) text.add(suffix(0));
  if (flags.has('e') && (is_cut || level > 0)) text.insert(0, '~');
}

// Zeros at the end of the fraction go with "z"; with "i" they stay unless
// there is nothing else.  The point goes when all have gone.
void Picture::strip_zeros(Text& text) const {
  const std::string_view view = text.view();
  std::int32_t end = text.length();
  for (std::int32_t left = precision; left > 0 && view[zx_size(end - 1)] == '0';
       --left)
    --end;
  if (view[zx_size(end - 1)] == '.')
    text.cut(end - 1);
  else if (flags.has('z'))
    text.cut(end);
}

// Three zeros at the end of a whole number become a suffix with "k", six
// with "m".
bool Picture::replace_zeros(Text& text) const {
  if (!flags.has('k') && !flags.has('m')) return false;
  if (text.has_point()) return false;
  const int thousands = flags.has('m') ? 2 : 1;
  const std::string_view zeros("000000",
                               static_cast<std::size_t>(3 * thousands));
  if (!text.view().ends_with(zeros)) return false;
  text.cut(text.length() - 3 * thousands);
  text.add(suffix(thousands));
  return true;
}

std::int32_t Picture::commas_wanted(const Text& text) const {
  if (!flags.has('c')) return 0;
  return (text.integer_length() - (has_letter(text) ? 1 : 0) - 1) / 3;
}

// Takes decimals off until the text fits, and the point with the last one;
// each adds to what is spare.  False if there are none.
bool Picture::cut_decimals(Text& text, std::int64_t& spare) const {
  const std::int32_t integer = text.integer_length();
  std::int32_t decimals = text.length() - integer - 1;
  if (decimals <= 0) return false;
  if (flags.has('e')) --spare;
  for (; spare < 0 && decimals > 0; ++spare) --decimals;
  if (decimals == 0) ++spare;
  text.cut(decimals > 0 ? integer + 1 + decimals : integer);
  return true;
}

void Picture::insert_commas(Text& text, std::int64_t count) const {
  std::int32_t at = text.integer_length() - (has_letter(text) ? 1 : 0);
  for (; count > 0; --count) {
    at -= 3;
    text.insert(at, ',');
  }
}

void Picture::add_signs(Text& text) const {
  if (is_negative && flags.has('f')) {
    text.insert(0, '(');
    text.add(')');
  } else if (is_negative || flags.has('s')) {
    const char sign = is_negative ? '-' : '+';
    if (flags.has('r'))
      text.add(sign);
    else
      text.insert(0, sign);
  }
  if (flags.has('p')) text.add('%');
  if (flags.has('d')) text.add('$');
}

bool append_in_picture(Output& out, double number, std::string_view pattern,
                       Measures measures) {
  Flags flags;
  if (!read_flags(pattern, flags)) return false;
  if (flags.has('b') && number == 0) {
    out.add_times(' ', measures.width);
    return true;
  }
  if (!ZX_ASSERT(measures.width < k_width_limit)) return false;
  Picture picture(flags, number, measures);

  constexpr std::size_t k_usual_room = 256;
  char usual_room[k_usual_room];
  zxStr large_room;
  char* bytes = usual_room;
  if (picture.text_room() > k_usual_room) {
    bytes = large_room.buffer(zx_count(picture.text_room()));
    if (bytes == nullptr) return false;
  }
  Text text(bytes);
  picture.write(text);
  out.add(text.view());
  return true;
}

}  // namespace

bool append_picture(Output& out, const Directive& directive,
                    const zxFmtArg& arg) {
  std::string_view middle = directive.middle();
  const Measures measures = read_measures(middle);
  if (!ZX_ASSERT(middle.empty() && !directive.has_long)) return false;
  const std::optional<double> number = number_of(arg);
  if (!number) return false;
  if (!std::isfinite(*number)) {
    out.add("#ERR");
    return true;
  }
  const std::string_view pattern =
      directive.has_bracket ? std::string_view(directive.bracket) : ",";
  return append_in_picture(out, *number, pattern, measures);
}

}  // namespace zxsfmt_detail

void set_precision_table(const zxPrecisionTable& fresh, zxPrecisionTable* old) {
  if (old != nullptr) *old = zxsfmt_detail::g_precisions;
  zxsfmt_detail::g_precisions = fresh;
}
