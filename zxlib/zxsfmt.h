// zxsfmt.h - the format language: text composed from a format and typed
// arguments.
//
//   #          the next argument in its default form
//   %...       the next argument in a form of one's own: "%5d", "%-20s",
//              "%.2f", "%[%H:%M]t", "%9[,]v"; it must be of a fitting type
//   $...       text that takes no argument: "$1" group 1 of the last pattern
//              match, "${name}" an entry of a table or of the environment,
//              "$s20" blanks up to column 20
//   ## %% $$   one such character
//   line feed  carriage return and line feed; line feeds inside arguments
//              stay as they are
//
// Any other byte stands for itself.  docs/formats.md has all directives and
// escapes.  Nothing that an argument holds is ever read as a format.
//
//   ZX_HERE;
//   zxStr line = sfmt("#: %-20s %[,]v (%t)\n", code, name, amount, date);
//
// A format that is not well-formed, an argument of a wrong type, too few or
// too many arguments make a format fail, which each entry answers in its own
// way; mistakes in formats never do harm.  A single output of a number, a
// character, a time or a pointer has up to 255 bytes, more fail an assertion;
// texts, and numbers by "%v", have no such limit.
//
// An argument whose whole text is "err" or "void", if it is met by any "%"
// directive as plain text, replaces all that was composed so far by that
// word: a value that is an error blanks the line up to there.
//
// Process-wide state: for each entry an environment, whose table stays set
// from call to call; the table of automatic precisions; the hooks.  One
// thread formats.
#ifndef ZXSFMT_H
#define ZXSFMT_H

#include <array>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <ctime>
#include <type_traits>

#include "zxaa.h"
#include "zxbfile.h"
#include "zxdate.h"
#include "zxqva.h"
#include "zxstr.h"
#include "zxtime.h"

// ------------------------------------------------------------- arguments --

namespace zxsfmt_detail {

// Types whose values are whole numbers of another type when they are
// reckoned with: small ones, and enumerations.  Characters are none.
template <class T, class Wide>
concept PromotesTo = (std::is_integral_v<T> || std::is_enum_v<T>)&&!(
    std::same_as<T, char> || std::same_as<T, unsigned char> ||
    std::same_as<T, wchar_t> || std::same_as<T, char8_t> ||
    std::same_as<T, char16_t> || std::same_as<T, char32_t>)&&requires(T value) {
  { +value } -> std::same_as<Wide>;
};

template <class T>
constexpr std::uint32_t pointer_tag() {
  if constexpr (std::same_as<T, char>) return 'z';
  if constexpr (std::same_as<T, std::time_t>) return 'm';
  return 'p';
}

}  // namespace zxsfmt_detail

// One argument: a tag that names the type, and the value or a pointer to it.
// Records live for one call and own nothing; what they point at must outlive
// the call.
//
//   tag  made from             holds     "#" shows
//   i    int and what          number    decimal
//        promotes to it
//   l    long                  number    decimal
//   u    unsigned int          number    decimal, without a sign
//   v    unsigned long         number    decimal, without a sign
//   c    char                  number    the character
//   b    unsigned char         number    "\x" and the byte in hexadecimal
//   f    double                real      15 significant digits, as in "12.5"
//   z    const char*           pointer   the text
//   s    zxStr                 pointer   the text
//   t    zxDate                pointer   "dd-mm-yy"
//   M    zxTime                pointer   "dd-mm-yyyy hh:mm:ss"
//   m    pointer to a time_t   pointer   "dd-mm-yy hh:mm:ss"; null is now
//   k    array of zxStr        pointer   the strings, a blank between them
//   p    any other pointer     pointer   its address in hexadecimal
//   3    zxSA<zxStr>           pointer   (is the table of a "$" escape)
//
// "#" with what it cannot show, a table among it, fails an assertion and adds
// nothing.  A long or unsigned long beyond 32 bits fails an assertion.  Types
// that are not here do not compile; a pointer to a long is one to a time_t
// where these are the same type.
struct zxFmtArg {
  // Tags without a type of their own.
  static constexpr std::uint32_t k_void = 0;    // of a list: no form at all
  static constexpr std::uint32_t k_text = 1;    // a zxStr that only "#" takes
  static constexpr std::uint32_t k_table = 3;   // a table of texts
  static constexpr std::uint32_t k_list = 4;    // see zx_fmt_take_from_list
  static constexpr std::uint32_t k_bool = 'B';  // of a list: "true", "false"

  std::uint32_t tag;
  union {
    std::int32_t number;
    double real;
    const void* pointer;
  };

  // The number without a sign.
  constexpr std::uint32_t word() const {
    return static_cast<std::uint32_t>(number);
  }

  constexpr zxFmtArg(zxsfmt_detail::PromotesTo<int> auto value)
      : tag('i'), number(value) {}
  constexpr zxFmtArg(zxsfmt_detail::PromotesTo<unsigned> auto value)
      : tag('u'), number(static_cast<std::int32_t>(value)) {}
  constexpr zxFmtArg(std::same_as<long> auto value)
      : tag('l'), number(narrowed<std::int32_t>(value)) {}
  constexpr zxFmtArg(std::same_as<unsigned long> auto value)
      : tag('v'),
        number(static_cast<std::int32_t>(narrowed<std::uint32_t>(value))) {}
  constexpr zxFmtArg(std::same_as<char> auto byte)
      : tag('c'), number(static_cast<signed char>(byte)) {}
  constexpr zxFmtArg(std::same_as<unsigned char> auto byte)
      : tag('b'), number(byte) {}
  constexpr zxFmtArg(std::same_as<double> auto value) : tag('f'), real(value) {}
  constexpr zxFmtArg(std::same_as<float> auto value) : tag('f'), real(value) {}
  template <class T>
  requires(!std::is_function_v<T> &&
           !std::is_volatile_v<T>) constexpr zxFmtArg(T* what)
      : tag(zxsfmt_detail::pointer_tag<std::remove_cv_t<T>>()), pointer(what) {}

  // Exactly these types: what only converts to one would be a temporary,
  // gone by the time that the record is read.
  zxFmtArg(const std::derived_from<zxStr> auto& text)
      : tag('s'), pointer(static_cast<const zxStr*>(&text)) {}
  zxFmtArg(const std::same_as<zxDate> auto& date) : tag('t'), pointer(&date) {}
  zxFmtArg(const std::same_as<zxTime> auto& time) : tag('M'), pointer(&time) {}
  zxFmtArg(const std::same_as<zxQVA<zxStr>> auto& texts)
      : tag('k'), pointer(&texts) {}
  zxFmtArg(const std::same_as<zxSA<zxStr>> auto& table)
      : tag(k_table), pointer(&table) {}

  // A record of any tag that holds a pointer.
  constexpr zxFmtArg(std::uint32_t any_tag, const void* what)
      : tag(any_tag), pointer(what) {}

 private:
  template <class Narrow>
  static constexpr Narrow narrowed(auto value) {
    const auto narrow = static_cast<Narrow>(value);
    ZX_ASSERT(narrow == value);
    return narrow;
  }
};

// ----------------------------------------------------------- environment --

// What a format can refer to: the names of "${name}" and "$%name%", and two
// directives that a program may give a meaning of its own.
class zxFmtEnv {
 public:
  constexpr zxFmtEnv() = default;
  zxFmtEnv(const zxFmtEnv&) = delete;
  zxFmtEnv& operator=(const zxFmtEnv&) = delete;
  virtual ~zxFmtEnv() = default;

  // The text of "%<" and of "%>", which take any argument; empty here.
  virtual zxStr fmt_left(const zxFmtArg& arg);
  virtual zxStr fmt_right(const zxFmtArg& arg);

  // The text of a name: that of the table if one is set, else the variable
  // of the process environment whose name is this one in upper case; empty
  // if there is none.
  virtual zxStr lookup(const zxStr& name);

  // Sets the table of lookup(), which is the caller's and must live for as
  // long as it is set; null for none.
  virtual void set_table(const zxSA<zxStr>* entries);

 protected:
  const zxSA<zxStr>* table = nullptr;
};

// ------------------------------------------------------------------ core --

// Composes into `out`, whose old text is dropped.  False on a bad format:
// `out` then holds the text so far and the rest of the format, from the
// directive that failed; left-over arguments give the complete text.  Only
// where "*" finds no int the rest is left out.
//
// `format` may be the text of `out`.  Arguments may not, but for a zxStr
// under "#", which adds what stands in it by then: such a text, such a
// string under "%" and groups of a match in it fail an assertion.
bool sfmt_core(zxStr& out, const char* format, zxFmtEnv& env,
               std::int32_t count, const zxFmtArg* args);

// For each number of decimals from 1 to 6 the highest value that "%v" shows
// with that many if no precision is given, 0 where it never does; entry 0
// does not count.  At first up to 5 with four decimals, up to 100 with two,
// up to 500 with one.
using zxPrecisionTable = std::array<double, 7>;

// Replaces the process-wide table and tells the former one, unless `old` is
// null.
void set_precision_table(const zxPrecisionTable& fresh, zxPrecisionTable* old);

// Appends a double's default form: up to 15 significant digits without
// trailing zeros, a tie away from zero; below 0.0001 and from 1e15 on with
// an exponent of at least three digits; "inf", "-inf", "nan".  No locale.
void append_number(zxStr& out, double number);

// ----------------------------------------------------------------- hooks --

// Takes the first element off a list, which is an argument of tag k_list and
// stands for one argument for each of its elements.  False for an empty
// list.  `element` may point to what lasts until the next element is taken;
// `is_last` tells that the list is empty now.  Without variants there are no
// lists; the module of variants sets this.
using zxTakeFromList = bool (*)(void* list, zxFmtArg& element, bool& is_last);
extern zxTakeFromList zx_fmt_take_from_list;

// What the escapes tell of the program; start-up sets it.  Null is empty.
struct zxFmtProgram {
  const zxQVA<zxStr>* args;  // "$%*" and "$%1" to "$%9"
  const zxStr* path;         // "$%0"
  const zxStr* name;         // "$%-"
};
extern zxFmtProgram zx_fmt_program;

// --------------------------------------------------------------- entries --
//
// Each takes a format and up to 15 arguments (bailf 16); more do not compile.

namespace zxsfmt_detail {

inline constexpr std::size_t k_max_args = 15;

// The entries, each with an environment of its own.
enum class Entry : std::uint8_t {
  sfmt,
  sfmt_to,
  sfmt_try,
  sfmt_try_s,
  bailf,
  bailfn,
  eprint,
  oprint,
  dprint,
  fprint,
};

// The environment of an entry, made when the first of its formats comes.
template <Entry>
zxFmtEnv& environment() {
  static zxFmtEnv env;
  return env;
}

// What the entries do behind composing; `good` tells how that went.
void fail_with_position();
inline void check_with_position(bool good) {
  if (!good) [[unlikely]]
    fail_with_position();
}
void bail_with(bool good, std::int32_t number, const zxStr& text);
void print(bool good, zxBFile& file, const zxStr& text);
void print_in_debugger(bool good, const zxStr& text);

// Composes with the arguments as records.
template <Entry entry, class... Args>
bool compose(zxStr& out, const char* format, const Args&... args) {
  constexpr std::size_t k_most =
      entry == Entry::bailf ? k_max_args + 1 : k_max_args;
  static_assert(sizeof...(Args) <= k_most, "too many arguments for a format");
  const std::array<zxFmtArg, sizeof...(Args)> list{zxFmtArg(args)...};
  return sfmt_core(out, format, environment<entry>(),
                   static_cast<std::int32_t>(list.size()), list.data());
}

}  // namespace zxsfmt_detail

// The composed text; a bad format is message 2006 with the position that
// ZX_HERE stored, and, should that be dropped, the text so far.
template <class... Args>
zxStr sfmt(const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  zxStr text;
  check_with_position(compose<Entry::sfmt>(text, format, args...));
  return text;
}

// The same into `out`, which is the result.
template <class... Args>
zxStr& sfmt_to(zxStr& out, const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  check_with_position(compose<Entry::sfmt_to>(out, format, args...));
  return out;
}

// The same, where a bad format is no failure: false, and `out` as sfmt_core()
// leaves it.
template <class... Args>
bool sfmt_try(zxStr& out, const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  return compose<Entry::sfmt_try>(out, format, args...);
}

// The same for a format in a string, up to its first NUL.
template <class... Args>
bool sfmt_try_s(zxStr& out, const zxStr& format, const Args&... args) {
  using namespace zxsfmt_detail;
  const zxStr held = format;  // it may be `out`
  return compose<Entry::sfmt_try_s>(out, held.c_str(), args...);
}

// Ends the process with the text as a message without a number.  From here
// on a bad format is message 2006 without a position, and nothing else
// happens.
template <class... Args>
void bailf(const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  zxStr text;
  const bool good = compose<Entry::bailf>(text, format, args...);
  bail_with(good, 0, text);
}

// Ends the process with a message of the table and the text as its
// parameter.
template <class... Args>
void bailfn(std::int32_t number, const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  zxStr text;
  const bool good = compose<Entry::bailfn>(text, format, args...);
  bail_with(good, number, text);
}

// Writes the text to a file, counting a line; no line end is added.
template <class... Args>
void fprint(zxBFile& file, const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  zxStr text;
  const bool good = compose<Entry::fprint>(text, format, args...);
  print(good, file, text);
}

// Writes the text to standard output, to standard error, to the debugger.
template <class... Args>
void oprint(const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  zxStr text;
  const bool good = compose<Entry::oprint>(text, format, args...);
  print(good, g_stdout, text);
}
template <class... Args>
void eprint(const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  zxStr text;
  const bool good = compose<Entry::eprint>(text, format, args...);
  print(good, g_stderr, text);
}
template <class... Args>
void dprint(const char* format, const Args&... args) {
  using namespace zxsfmt_detail;
  zxStr text;
  const bool good = compose<Entry::dprint>(text, format, args...);
  print_in_debugger(good, text);
}

#endif  // ZXSFMT_H
