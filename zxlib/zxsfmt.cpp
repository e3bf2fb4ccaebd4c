// zxsfmt.cpp - the format language: scanner, default forms, environments.
// Tests: tests/zxlib/zxsfmt_test.cpp, zxsfmt_model_test.cpp.
#include "zxsfmt.h"

#include <array>
#include <charconv>
#include <cstring>
#include <string_view>

#include "zxplat.h"
#include "zxregexe.h"
#include "zxsfmt_impl.h"

zxTakeFromList zx_fmt_take_from_list = [](void*, zxFmtArg&, bool&) {
  return false;
};
zxFmtProgram zx_fmt_program = {};

namespace zxsfmt_detail {
namespace {

// ---- bytes that mean something

constexpr auto make_special() {
  std::array<bool, 256> table{};
  for (const char byte : {'\0', '\n', '#', '%', '$'})
    table[static_cast<unsigned char>(byte)] = true;
  return table;
}
constexpr auto k_special = make_special();

// The first byte that means something.
const char* skip_plain(const char* at) {
  while (!k_special[static_cast<unsigned char>(*at)]) ++at;
  return at;
}

// ---- default forms

// As in "\xc8".
void append_byte(Output& out, std::uint8_t byte) {
  constexpr std::string_view k_digits = "0123456789abcdef";
  out.add("\\x");
  if (byte >= 16) out.add(k_digits[byte >> 4]);
  out.add(k_digits[byte & 0xF]);
}

// The default form of an argument.
void append_default_form(Output& out, const zxFmtArg& arg) {
  switch (arg.tag) {
    case 'i':
    case 'l':
      return append_whole(out, arg.number);
    case 'u':
    case 'v':
      return append_whole(out, arg.word());
    case 'c':
      out.add(static_cast<char>(arg.number));
      return;
    case 'b':
      return append_byte(out, static_cast<std::uint8_t>(arg.word()));
    case zxFmtArg::k_bool:
      return out.add(arg.word() != 0 ? "true" : "false");
    case 'f':
      return append_number(out, arg.real);
    case 'z':
      return out.add(static_cast<const char*>(arg.pointer));
    case 's':
    case zxFmtArg::k_text:
      out.add(pointee<zxStr>(arg));
      return;
    case 't':
      out.add(pointee<zxDate>(arg).to_text());
      return;
    case 'M':
      out.add(pointee<zxTime>(arg).to_text());
      return;
    case 'm':
      out.add(format_time_t(moment_of(arg), 0));
      return;
    case 'k':
      out.add(joined(pointee<zxQVA<zxStr>>(arg), " "));
      return;
    case 'p':
      return append_address(out, arg.pointer);
    default:
      ZX_ASSERT(false);
  }
}

// ---- one pass over a format

class Composer {
 public:
  Composer(zxStr& text, const char* format, zxFmtEnv& environment,
           std::int32_t arg_count, const zxFmtArg* arg_list)
      : out(text),
        at(format),
        env(environment),
        left(arg_count),
        args(arg_list),
        lost_match(out.stood_on(zx_match.start[0]) ? zx_match.start[0]
                                                   : nullptr) {}

  bool run();

 private:
  // How a directive went.  All but the silent failure of a "*" leave the
  // rest of the format.
  enum class Outcome : std::uint8_t { done, failed, failed_silently };

  static Outcome outcome_of(bool good) {
    return good ? Outcome::done : Outcome::failed;
  }

  const zxFmtArg* take();
  const zxFmtArg* take_from_list();
  const zxFmtArg* checked(const zxFmtArg* arg);
  Outcome step();
  bool placeholder();
  Outcome percent();
  bool side(bool is_left);
  Outcome read(Directive& directive);
  Outcome read_number(Directive& directive);
  bool read_bracket(Directive& directive);
  bool dispatch(const Directive& directive);
  void set_table(const zxFmtArg& arg);
  bool dollar();

  Output out;
  const char* at;
  zxFmtEnv& env;
  std::int32_t left;
  const zxFmtArg* args;
  zxFmtArg element = 0;          // of a list
  const char* const lost_match;  // found in the text that the result was
};

bool Composer::run() {
  for (;;) {
    const char* const plain = at;
    at = skip_plain(at);
    if (at != plain) out.add(std::string_view(plain, zx_distance(plain, at)));
    if (*at == '\0') return left == 0;
    if (*at == '\n') {
      out.add("\r\n");
      ++at;
      continue;
    }
    const char* const mark = at;
    const Outcome outcome = step();
    if (outcome == Outcome::done) continue;
    if (outcome == Outcome::failed) out.add(mark);
    return false;
  }
}

// The next argument, which lasts until the one behind it is taken; null if
// there is none.  A text that must not be read fails and counts as empty.
inline const zxFmtArg* Composer::take() {
  if (left == 0) return nullptr;
  if (args->tag == zxFmtArg::k_list) [[unlikely]]
    return take_from_list();
  --left;
  return checked(args++);
}

// A list stays the next argument until its last element is taken.
const zxFmtArg* Composer::take_from_list() {
  bool is_last = false;
  if (!zx_fmt_take_from_list(const_cast<void*>(args->pointer), element,
                             is_last))
    return nullptr;
  if (is_last) left = 0;
  return checked(&element);
}

inline const zxFmtArg* Composer::checked(const zxFmtArg* arg) {
  if (arg->tag != 'z' ||
      ZX_ASSERT(arg->pointer != nullptr && !out.stood_on(arg->pointer)))
    return arg;
  element = "";
  return &element;
}

// Carries out what stands at a mark and steps over it.
Composer::Outcome Composer::step() {
  const char mark = *at++;
  if (*at == mark) {
    out.add(mark);
    ++at;
    return Outcome::done;
  }
  switch (mark) {
    case '#':
      return outcome_of(placeholder());
    case '$':
      return outcome_of(dollar());
    default:
      return percent();
  }
}

bool Composer::placeholder() {
  const zxFmtArg* arg = take();
  if (arg == nullptr) return false;
  append_default_form(out, *arg);
  return true;
}

void Composer::set_table(const zxFmtArg& arg) {
  env.set_table(static_cast<const zxSA<zxStr>*>(arg.pointer));
  out.reload();  // it is another's code
}

bool Composer::dollar() {
  if (left > 0 && args->tag == zxFmtArg::k_table) set_table(*take());
  return append_escape(out, at, env, lost_match);
}

// ---- directives

Composer::Outcome Composer::percent() {
  if (*at == '<' || *at == '>') return outcome_of(side(*at++ == '<'));
  Directive directive;
  const Outcome outcome = read(directive);
  if (outcome != Outcome::done) return outcome;
  return outcome_of(dispatch(directive));
}

bool Composer::side(bool is_left) {
  const zxFmtArg* arg = take();
  if (arg == nullptr) return false;
  const zxStr text = is_left ? env.fmt_left(*arg) : env.fmt_right(*arg);
  out.reload();  // it is another's code
  out.add(text);
  return true;
}

// %[flags][width][.precision][bracket][l]letter
Composer::Outcome Composer::read(Directive& directive) {
  directive.add('%');
  while (*at == ' ' || *at == '#' || *at == '+' || *at == '-')
    directive.add(*at++);
  Outcome outcome = read_number(directive);
  if (outcome == Outcome::done && *at == '.') {
    directive.add(*at++);
    outcome = read_number(directive);
  }
  if (outcome != Outcome::done) return outcome;
  if (*at == '[' && !read_bracket(directive)) return Outcome::failed;
  if (*at == 'l') {
    directive.has_long = true;
    ++at;
  }
  directive.add(*at);
  if (*at != '\0') ++at;
  return outcome_of(!directive.is_too_long());
}

// Digits, or the int of a "*".
Composer::Outcome Composer::read_number(Directive& directive) {
  if (*at != '*') {
    while (zx_is_digit(*at)) directive.add(*at++);
    return Outcome::done;
  }
  ++at;
  const zxFmtArg* arg = take();
  if (arg == nullptr || arg->tag != 'i') return Outcome::failed_silently;
  char digits[12];
  const char* const end =
      std::to_chars(digits, digits + sizeof digits, arg->number).ptr;
  for (const char* p = digits; p != end; ++p) directive.add(*p);
  return Outcome::done;
}

// False for one that is too long or never ends.
bool Composer::read_bracket(Directive& directive) {
  const char* const start = ++at;
  while (*at != ']')
    if (*at++ == '\0') return false;
  return directive.set_bracket({start, zx_distance(start, at++)});
}

// A value that could not be worked out comes as one of two words, and takes
// the place of all that stands ahead of it.
bool replaces_all(const zxFmtArg& arg) {
  if (arg.tag != 'z') return false;
  const std::string_view text = static_cast<const char*>(arg.pointer);
  return text == "err" || text == "void";
}

bool Composer::dispatch(const Directive& directive) {
  const zxFmtArg* arg = take();
  if (arg == nullptr) return false;
  if (!replaces_all(*arg)) return append_directive(out, directive, *arg);
  out.replace(static_cast<const char*>(arg->pointer));
  return true;
}

}  // namespace

// ---- the result

char* Output::grow(std::int64_t n) {
  if (!ZX_ASSERT(n <= INT32_MAX)) return nullptr;
  char* const place = string.tail(static_cast<std::int32_t>(n));
  if (place == nullptr) return nullptr;
  end = place;
  limit = end + (string.capacity() - string.length());
  return end;
}

void Output::add_times(char byte, std::int64_t n) {
  if (n <= 0) return;
  char* const to = room(n);
  if (to == nullptr) return;
  std::memset(to, byte, static_cast<std::size_t>(n));
  take_to(to + n);
}

// ---- the entries

void fail_with_position() { bail_code(2006, pos_string(zx_pos)); }

void bail_with(bool good, std::int32_t number, const zxStr& text) {
  good ? bail_code(number, text) : bail_code(2006);
}

void print(bool good, zxBFile& file, const zxStr& text) {
  good ? file.puts(text) : bail_code(2006);
}

void print_in_debugger(bool good, const zxStr& text) {
  good ? zxplat::process.debug_output(text.c_str()) : bail_code(2006);
}

}  // namespace zxsfmt_detail

bool sfmt_core(zxStr& out, const char* format, zxFmtEnv& env,
               std::int32_t count, const zxFmtArg* args) {
  using namespace zxsfmt_detail;
  if (lies_in(out.c_str(), zx_size(out.capacity()), format)) {
    const zxStr held = format;
    return sfmt_core(out, held.c_str(), env, count, args);
  }
  if (out.length() != 0) out.set_length(0);
  if (!ZX_ASSERT(format != nullptr)) return false;
  return Composer(out, format, env, count, args).run();
}

// ---- the environment

zxStr zxFmtEnv::fmt_left(const zxFmtArg&) { return {}; }
zxStr zxFmtEnv::fmt_right(const zxFmtArg&) { return {}; }

zxStr zxFmtEnv::lookup(const zxStr& name) {
  if (table != nullptr) return table->get(name);
  zxStr variable = name;
  variable.to_upper();
  const char* const value = zxplat::environment_variable(variable.c_str());
  return value != nullptr ? zxStr(value) : zxStr();
}

void zxFmtEnv::set_table(const zxSA<zxStr>* entries) { table = entries; }
