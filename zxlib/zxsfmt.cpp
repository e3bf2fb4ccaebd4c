// zxsfmt.cpp - the format language: scanner and default forms.
// Tests: tests/zxlib/zxsfmt_test.cpp.
#include "zxsfmt.h"

#include <cstring>

#include "zxtext.h"

namespace {

// One pass over a format.
class Composer {
 public:
  Composer(zxStr& text, const char* format, std::int32_t arg_count,
           const zxFmtArg* arg_list)
      : out(text), at(format), left(arg_count), args(arg_list) {}

  bool run();

 private:
  bool directive();
  bool placeholder();
  bool percent();
  const zxFmtArg* take() { return left > 0 ? (--left, args++) : nullptr; }

  zxStr& out;
  const char* at;
  std::int32_t left;
  const zxFmtArg* args;
};

bool is_mark(char byte) { return byte == '#' || byte == '%' || byte == '$'; }

// The bytes up to the next that means something.
std::size_t plain_run(const char* text) { return std::strcspn(text, "#%$\n"); }

void append_int(zxStr& out, std::int32_t number) {
  char room[12];
  zxText digits(room);
  digits.add_int(number);
  out.append(room, zx_count(digits.length()));
}

template <class T>
const T& pointee(const zxFmtArg& arg) {
  return *reinterpret_cast<const T*>(arg.value);
}

void append_default_form(zxStr& out, const zxFmtArg& arg) {
  switch (arg.tag) {
    case 'i':
      append_int(out, static_cast<std::int32_t>(arg.value));
      break;
    case 'c':
      out.append(static_cast<char>(arg.value));
      break;
    case 'z':
      out.append(reinterpret_cast<const char*>(arg.value));
      break;
    case 's':
      out.append(pointee<zxStr>(arg));
      break;
    case 'f':
      append_number(out, pointee<double>(arg));
      break;
    case 't':
      out.append(pointee<zxDate>(arg).to_text());
      break;
    default:
      ZX_ASSERT(false);
  }
}

bool Composer::run() {
  out.set_length(0);
  while (*at != '\0') {
    const std::size_t plain = plain_run(at);
    if (plain > 0) out.append(at, zx_count(plain));
    at += plain;
    if (*at == '\n') {
      out.append("\r\n", 2);
      ++at;
    } else if (*at != '\0' && !directive()) {
      out.append(at);
      return false;
    }
  }
  return left == 0;
}

// Carries out the directive at `at` and steps over it; on failure `at` stays
// at its mark.
bool Composer::directive() {
  if (is_mark(*at) && at[1] == *at) {
    out.append(*at);
    at += 2;
    return true;
  }
  switch (*at) {
    case '#':
      return placeholder();
    case '%':
      return percent();
    default:
      return false;
  }
}

bool Composer::placeholder() {
  const zxFmtArg* arg = take();
  if (arg == nullptr) return false;
  append_default_form(out, *arg);
  ++at;
  return true;
}

bool Composer::percent() {
  if (at[1] != 't') return false;
  const zxFmtArg* arg = take();
  if (arg == nullptr || arg->tag != 't') return false;
  append_default_form(out, *arg);
  at += 2;
  return true;
}

}  // namespace

bool sfmt_core(zxStr& out, const char* format, std::int32_t count,
               const zxFmtArg* args) {
  return Composer(out, format, count, args).run();
}

namespace zxsfmt_detail {

void fail_with_position() { bail_code(2006, pos_string(zx_pos)); }
void fail() { bail_code(2006); }
void bail_text(const zxStr& text) { bail_code(0, text); }

}  // namespace zxsfmt_detail
