// zxsfmt_escape.cpp - the "$" escapes: text that takes no argument.
// Tests: tests/zxlib/zxsfmt_test.cpp.
#include <algorithm>

#include "zxregexe.h"
#include "zxsfmt_impl.h"
#include "zxstrm.h"

namespace zxsfmt_detail {
namespace {

// Reads digits at a place and steps over them; 0 if there are none.
std::int32_t digits_at(const char*& at) {
  const char* end = at;
  while (zx_is_digit(*end)) ++end;
  std::string_view digits(at, zx_distance(at, end));
  at = end;
  return read_digits(digits);
}

// A match that was found in the result's own bytes cannot be shown.
void append_group(Output& out, std::int32_t slot, const char* lost_match) {
  const bool is_lost = lost_match != nullptr && zx_match.start[0] == lost_match;
  if (ZX_ASSERT(!is_lost)) out.add(group_text(slot));
}

void append_now(Output& out, std::int32_t form) {
  out.add(format_time_t({}, form));
}

// ---- columns

// "$c79": no text beyond that column.
void cut_at_column(Output& out, std::int32_t column) {
  constexpr std::int32_t k_usual = 79;
  if (column == 0) column = k_usual;
  if (out.length() > column) out.cut(column);
}

// "$s20": blanks up to that column; without one, up to the next tab stop.
void fill_to_column(Output& out, std::int64_t column) {
  constexpr std::int32_t k_tab = 10;
  if (column == 0) column = (out.length() / k_tab + std::int64_t{1}) * k_tab;
  out.add_times(' ', column - out.length());
}

// "$r-=79": a text, of which the first byte may be anything and the others no
// digits, so many times.
bool repeat(Output& out, const char*& at) {
  const char* const start = at;
  if (*at == '\0') return false;
  do ++at;
  while (*at != '\0' && !zx_is_digit(*at));
  if (*at == '\0') return false;
  const std::size_t size = zx_distance(start, at);
  const std::int32_t count = digits_at(at);
  if (size == 1) {
    out.add_times(*start, count);
    return true;
  }
  char* to = out.room(static_cast<std::int64_t>(size) * count);
  if (to == nullptr) return true;
  for (std::int32_t i = 0; i < count; ++i) to = std::copy_n(start, size, to);
  out.take_to(to);
  return true;
}

// ---- references

void append_if(Output& out, const zxStr* text) {
  if (text != nullptr) out.add(*text);
}

void append_arg(Output& out, std::int32_t n) {
  if (zx_fmt_program.args != nullptr)
    out.add(zx_fmt_program.args->get_or(n - 1));
}

void append_args(Output& out) {
  if (zx_fmt_program.args != nullptr)
    out.add(joined(*zx_fmt_program.args, " "));
}

// A name up to the closing byte, which may be missing.
void append_named(Output& out, const char*& at, char closing, zxFmtEnv& env) {
  const char* const start = at;
  while (zx_is(*at, k_class_latin | k_class_digit) || *at == '_') ++at;
  const zxStr name(start, zx_count(zx_distance(start, at)));
  if (*at == closing) ++at;
  const zxStr text = env.lookup(name);
  out.reload();  // it is another's code
  out.add(text);
}

// What stands behind "$%" and "${".  The forms of one byte have no closing
// byte.
void append_reference(Output& out, const char*& at, char closing,
                      zxFmtEnv& env) {
  switch (*at) {
    case '*':
      append_args(out);
      break;
    case '0':
      append_if(out, zx_fmt_program.path);
      break;
    case '-':
      append_if(out, zx_fmt_program.name);
      break;
    default:
      if (!zx_is_digit(*at)) return append_named(out, at, closing, env);
      append_arg(out, *at - '0');
  }
  ++at;
}

}  // namespace

bool append_escape(Output& out, const char*& at, zxFmtEnv& env,
                   const char* lost_match) {
  const char letter = *at;
  if (letter == '\0') return false;
  ++at;
  switch (letter) {
    case '`':
      append_group(out, zxMatch::k_before, lost_match);
      return true;
    case '\'':
      append_group(out, zxMatch::k_after, lost_match);
      return true;
    case 'T':
      append_now(out, 3);
      return true;
    case 'd':
      append_now(out, 1);
      return true;
    case 't':
      append_now(out, 2);
      return true;
    case 'M':
      return true;
    case 'c':
      cut_at_column(out, digits_at(at));
      return true;
    case 's':
      fill_to_column(out, digits_at(at));
      return true;
    case 'r':
      return repeat(out, at);
    case '%':
      append_reference(out, at, '%', env);
      return true;
    case '{':
      append_reference(out, at, '}', env);
      return true;
    default:
      if (!zx_is_digit(letter)) return false;
      append_group(out, letter - '0', lost_match);
      return true;
  }
}

}  // namespace zxsfmt_detail
