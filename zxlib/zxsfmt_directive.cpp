// zxsfmt_directive.cpp - the "%" directives, by their letter.
// Tests: tests/zxlib/zxsfmt_test.cpp, zxsfmt_number_test.cpp.
#include <algorithm>
#include <charconv>
#include <cmath>

#include "zxplat.h"
#include "zxsfmt_impl.h"

namespace zxsfmt_detail {
namespace {

// ---- fields of limited length

// What stands between "%" and the letter, as it counts for all outputs but
// padded texts: flags in any order, a width, of which zeros at its front are
// a flag, and a precision.
struct Form {
  bool left = false;
  bool plus = false;
  bool blank = false;
  bool alternate = false;
  bool zeros = false;
  Measures measures;
};

Form read_form(std::string_view text) {
  Form form;
  for (; !text.empty(); text.remove_prefix(1)) {
    const char byte = text.front();
    if (byte == '-')
      form.left = true;
    else if (byte == '+')
      form.plus = true;
    else if (byte == ' ')
      form.blank = true;
    else if (byte == '#')
      form.alternate = true;
    else if (byte == '0')
      form.zeros = true;
    else
      break;
  }
  form.measures = read_measures(text);
  return form;
}

constexpr std::int64_t k_field_limit = 256;

// Appends a field: a prefix and a body, `zeros` between them, blanks around
// them up to the width.
bool append_field(Output& out, const Form& form, std::string_view prefix,
                  std::int64_t zeros, std::string_view body) {
  const std::int64_t length =
      static_cast<std::int64_t>(prefix.size() + body.size()) + zeros;
  const std::int64_t total =
      std::max<std::int64_t>(length, form.measures.width);
  if (!ZX_ASSERT(total < k_field_limit)) return false;
  char* to = out.room(total);
  if (to == nullptr) return false;
  const auto blanks = static_cast<std::size_t>(total - length);
  if (!form.left) to = std::fill_n(to, blanks, ' ');
  to = std::copy_n(prefix.data(), prefix.size(), to);
  to = std::fill_n(to, zeros, '0');
  zx_copy(to, body.data(), body.size());
  to += body.size();
  if (form.left) to = std::fill_n(to, blanks, ' ');
  out.take_to(to);
  return true;
}

// A number: where zeros fill the width they stand behind the sign.
bool append_signed_field(Output& out, const Form& form, std::string_view prefix,
                         std::int64_t zeros, std::string_view body,
                         bool may_fill) {
  if (may_fill && form.zeros && !form.left) {
    const std::int64_t length =
        static_cast<std::int64_t>(prefix.size() + body.size());
    zeros = std::max(zeros, form.measures.width - length);
  }
  return append_field(out, form, prefix, zeros, body);
}

// The same for a text, of which a precision keeps the start.
bool append_text_field(Output& out, std::string_view spec,
                       std::string_view text) {
  const Form form = read_form(spec);
  if (form.measures.precision >= 0)
    text = text.substr(0, zx_size(form.measures.precision));
  return append_field(out, form, {}, 0, text);
}

std::string_view sign_of(bool is_negative, const Form& form) {
  if (is_negative) return "-";
  if (form.plus) return "+";
  return form.blank ? " " : "";
}

// ---- whole numbers

bool is_integer(const zxFmtArg& arg) {
  switch (arg.tag) {
    case 'l':
    case 'v':
    case 'i':
    case 'u':
    case 'c':
    case 'b':
    case zxFmtArg::k_bool:
      return true;
    default:
      return false;
  }
}

std::string_view base_prefix(char letter, std::uint32_t value,
                             const Form& form) {
  if (!form.alternate || value == 0) return {};
  return letter == 'x' ? "0x" : letter == 'X' ? "0X" : "";
}

int base_of(char letter) {
  return letter == 'o' ? 8 : letter == 'x' || letter == 'X' ? 16 : 10;
}

void to_upper(char* text, char* end) {
  std::transform(text, end, text, zx_upper);
}

bool append_integer(Output& out, const Directive& directive,
                    const zxFmtArg& arg) {
  if (!is_integer(arg)) return false;
  const Form form = read_form(directive.middle());
  const char letter = directive.letter();
  const bool is_signed = letter == 'd' || letter == 'i';
  const bool is_negative = is_signed && arg.number < 0;
  const std::uint32_t value = is_negative ? 0U - arg.word() : arg.word();
  char digits[16];
  char* end = digits;
  if (value != 0 || form.measures.precision != 0)
    end = std::to_chars(digits, digits + sizeof digits, value, base_of(letter))
              .ptr;
  if (letter == 'X') to_upper(digits, end);
  const std::string_view body(digits, zx_distance(digits, end));
  std::int64_t zeros = std::max<std::int64_t>(
      0, form.measures.precision - static_cast<std::int64_t>(body.size()));
  if (letter == 'o' && form.alternate && zeros == 0 && !body.starts_with('0'))
    zeros = 1;
  return append_signed_field(
      out, form,
      is_signed ? sign_of(is_negative, form) : base_prefix(letter, value, form),
      zeros, body, form.measures.precision < 0);
}

// A NUL ends the field that it stands in.
bool append_character(Output& out, const Directive& directive,
                      const zxFmtArg& arg) {
  if (!is_integer(arg) || arg.tag == zxFmtArg::k_bool) return false;
  const Form form = read_form(directive.middle());
  const char byte = static_cast<char>(arg.number);
  if (byte != '\0') return append_field(out, form, {}, 0, {&byte, 1});
  if (!ZX_ASSERT(form.measures.width < k_field_limit)) return false;
  if (!form.left) out.add_times(' ', form.measures.width - 1);
  return true;
}

// ---- doubles

// Numbers of more than this many decimals are too long for a field.
constexpr std::int32_t k_most_decimals = k_field_limit;

// The text of a finite number without its sign; `out` has room for it.
char* write_magnitude(char* out, double number, char letter,
                      std::int32_t precision, bool alternate) {
  switch (letter) {
    case 'f':
      out = write_fixed(out, number, precision);
      if (alternate && precision == 0) *out++ = '.';
      return out;
    case 'e':
      return write_exponent(out, number, precision, alternate);
    default:
      return write_general(out, number, std::max(precision, 1), alternate);
  }
}

bool append_double(Output& out, const Directive& directive,
                   const zxFmtArg& arg) {
  if (arg.tag != 'f') return false;
  constexpr std::int32_t k_usual_precision = 6;
  const Form form = read_form(directive.middle());
  const char letter = zx_lower(directive.letter());
  std::int32_t precision = form.measures.precision;
  if (precision < 0) precision = k_usual_precision;
  const bool is_number = std::isfinite(arg.real);
  if (letter == 'g' && !form.alternate)
    precision = std::min(precision, k_most_digits);
  else if (is_number && !ZX_ASSERT(precision < k_most_decimals))
    return false;

  char text[k_most_digits + k_most_decimals];
  char* end;
  if (is_number)
    end = write_magnitude(text, std::fabs(arg.real), letter, precision,
                          form.alternate);
  else
    end = std::copy_n(std::isnan(arg.real) ? "nan" : "inf", 3, text);
  if (is_number && letter != directive.letter()) to_upper(text, end);
  const std::string_view sign =
      std::isnan(arg.real) ? "" : sign_of(std::signbit(arg.real), form);
  return append_signed_field(out, form, sign, 0, {text, zx_distance(text, end)},
                             is_number);
}

// ---- addresses

constexpr std::size_t k_address_digits = 2 * sizeof(void*);

void write_address(char* out, const void* address) {
  auto rest = reinterpret_cast<std::uintptr_t>(address);
  for (std::size_t i = k_address_digits; i-- > 0; rest >>= 4)
    out[i] = "0123456789ABCDEF"[rest & 0xF];
}

bool append_pointer(Output& out, const Directive& directive,
                    const zxFmtArg& arg) {
  if (arg.tag != 'p') return false;
  char digits[k_address_digits];
  write_address(digits, arg.pointer);
  return append_field(out, read_form(directive.middle()), {}, 0,
                      {digits, k_address_digits});
}

// ---- padded texts

// Flags count in this order only: "#" keeps the end of a text that is cut,
// "-" puts the blanks behind it.
void append_padded(Output& out, std::string_view spec, std::string_view text) {
  const auto read_flag = [&](char flag) {
    const bool is_set = spec.starts_with(flag);
    if (is_set) spec.remove_prefix(1);
    return is_set;
  };
  const bool keeps_end = read_flag('#');
  const bool left = read_flag('-');
  const Measures measures = read_measures(spec);
  if (measures.precision >= 0 && text.size() > zx_size(measures.precision)) {
    const std::size_t kept = zx_size(measures.precision);
    text = keeps_end ? text.substr(text.size() - kept) : text.substr(0, kept);
  }
  const std::int64_t blanks =
      measures.width - static_cast<std::int64_t>(text.size());
  if (!left) out.add_times(' ', blanks);
  out.add(text);
  if (left) out.add_times(' ', blanks);
}

// The text of an argument that is one; false for another, and for `out`,
// which has been emptied.
bool read_text(const Output& out, const zxFmtArg& arg, std::string_view& text) {
  if (arg.tag == 'z') {
    text = static_cast<const char*>(arg.pointer);
    return true;
  }
  if (arg.tag != 's' || !ZX_ASSERT(arg.pointer != &out.text())) return false;
  text = pointee<zxStr>(arg).view();
  return true;
}

bool append_text(Output& out, const Directive& directive, const zxFmtArg& arg) {
  std::string_view text;
  if (!read_text(out, arg, text)) return false;
  append_padded(out, directive.middle(), text);
  return true;
}

bool append_reversed(Output& out, const Directive& directive,
                     const zxFmtArg& arg) {
  std::string_view text;
  if (!read_text(out, arg, text)) return false;
  zxStr reversed;
  if (char* const start = reversed.tail(zx_count(text.size()))) {
    std::reverse_copy(text.begin(), text.end(), start);
    reversed.extend(zx_count(text.size()));
  }
  append_padded(out, directive.middle(), reversed.view());
  return true;
}

// Takes a point and a single digit off the end; the digit, 0 if there are
// none.
int cut_digit(std::string_view& spec) {
  const std::size_t size = spec.size();
  if (size < 2 || spec[size - 2] != '.' || !zx_is_digit(spec[size - 1]))
    return 0;
  const int digit = spec[size - 1] - '0';
  spec.remove_suffix(2);
  return digit;
}

bool append_list(Output& out, const Directive& directive, const zxFmtArg& arg) {
  if (arg.tag != 'k') return false;
  std::string_view spec = directive.middle();
  const bool by_lines = cut_digit(spec) == 1;
  const zxStr text =
      joined(pointee<zxQVA<zxStr>>(arg), by_lines ? "\r\n" : " ");
  append_padded(out, spec, text.view());
  return true;
}

// ---- dates and times

bool is_time(const zxFmtArg& arg) { return arg.tag == 'M' || arg.tag == 'm'; }

bool append_form_of_time(Output& out, const Directive& directive,
                         const zxFmtArg& arg) {
  if (!is_time(arg)) return false;
  std::string_view spec = directive.middle();
  const int form = cut_digit(spec);
  constexpr int k_forms = 6;
  if (!ZX_ASSERT(form < k_forms)) return false;
  const zxStr text = format_time_t(moment_of(arg), form);
  return append_text_field(out, spec, text.view());
}

bool append_date(Output& out, const Directive& directive, const zxFmtArg& arg) {
  zxDate date;
  if (arg.tag == 't')
    date = pointee<zxDate>(arg);
  else if (arg.tag == 'M')
    date.set_from_time(pointee<zxTime>(arg));
  else
    return false;
  const zxStr text = date.to_text();
  return append_text_field(out, directive.middle(), text.view());
}

bool append_formed_time(Output& out, const Directive& directive,
                        const zxFmtArg& arg) {
  std::string_view spec = directive.middle();
  read_measures(spec);
  if (!ZX_ASSERT(spec.empty() && !directive.has_long)) return false;
  if (!is_time(arg) && arg.tag != 't') return false;
  const zxStr text = format_moment(*moment_of(arg), directive.bracket);
  append_padded(out, directive.middle(), text.view());
  return true;
}

}  // namespace

// ---- by letter

bool append_directive(Output& out, const Directive& directive,
                      const zxFmtArg& arg) {
  const char letter = directive.letter();
  const bool takes_bracket = letter == 'T' || letter == 't' || letter == 'v';
  if (directive.has_bracket && !takes_bracket) return false;
  switch (letter) {
    case 'd':
    case 'i':
    case 'o':
    case 'u':
    case 'x':
    case 'X':
      return append_integer(out, directive, arg);
    case 'c':
      return append_character(out, directive, arg);
    case 'e':
    case 'E':
    case 'f':
    case 'g':
    case 'G':
      return append_double(out, directive, arg);
    case 'p':
      return append_pointer(out, directive, arg);
    case 's':
      return append_text(out, directive, arg);
    case 'z':
      return arg.tag == 'z' && append_text(out, directive, arg);
    case 'h':
      return append_reversed(out, directive, arg);
    case 'L':
      return append_list(out, directive, arg);
    case 'T':
      return append_form_of_time(out, directive, arg);
    case 't':
      return directive.has_bracket ? append_formed_time(out, directive, arg)
                                   : append_date(out, directive, arg);
    case 'v':
      return append_picture(out, directive, arg);
    default:
      return false;
  }
}

// ---- pieces

void append_whole(Output& out, std::int64_t number) {
  constexpr std::int64_t k_room = 21;
  char* end = out.room(k_room);
  if (end == nullptr) return;
  if (number < 0) *end++ = '-';
  out.take_to(write_whole(end, static_cast<std::uint64_t>(std::abs(number))));
}

void append_address(Output& out, const void* address) {
  char digits[k_address_digits];
  write_address(digits, address);
  out.add(std::string_view(digits, k_address_digits));
}

std::int32_t read_digits(std::string_view& text) {
  std::int64_t number = 0;
  for (; !text.empty() && zx_is_digit(text.front()); text.remove_prefix(1))
    number =
        std::min<std::int64_t>(number * 10 + (text.front() - '0'), INT32_MAX);
  return static_cast<std::int32_t>(number);
}

Measures read_measures(std::string_view& text) {
  Measures measures;
  if (!text.empty() && zx_is_digit(text.front()))
    measures.width = read_digits(text);
  if (!text.starts_with('.') || text.starts_with(".-")) return measures;
  text.remove_prefix(1);
  measures.precision = read_digits(text);
  return measures;
}

zxStr joined(const zxQVA<zxStr>& texts, const char* between) {
  zxStr text;
  for (std::int32_t i = 0; i < texts.length(); ++i) {
    if (i > 0) text.append(between);
    text.append(texts.get(i));
  }
  return text;
}

std::optional<std::int64_t> moment_of(const zxFmtArg& arg) {
  if (arg.tag == 'M') return pointee<zxTime>(arg).to_time_t();
  if (arg.tag == 't') return start_of_day(pointee<zxDate>(arg));
  if (arg.pointer == nullptr) return zxplat::process.clock();
  return pointee<std::time_t>(arg);
}

}  // namespace zxsfmt_detail
