// zxsfmt.h - the format language: text composed from a format and typed
// arguments.
//
//   #          the next argument in its default form
//   %t         the next argument, a date, as "dd-mm-yy"
//   ## %% $$   one such character
//   line feed  carriage return and line feed; line feeds inside arguments
//              stay as they are
//
// Any other byte stands for itself; a mark with anything else behind it is
// an unknown directive.  Default forms: whole numbers in
// decimal, texts and strings as they are, characters as that byte, dates as
// above, doubles with up to 15 significant digits as in "12.5", "1e+015".
//
// A format with an unknown directive, with too few or with too many
// arguments fails; nothing that an argument holds is ever read as a format.
// Each entry takes up to 15 arguments (bailf 16), more do not compile, and
// neither does an argument whose type has no form here.
//
//   ZX_HERE;
//   zxStr line = sfmt("#: # (%t)\n", code, name, date);
#ifndef ZXSFMT_H
#define ZXSFMT_H

#include <array>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "zxbfile.h"
#include "zxdate.h"
#include "zxstr.h"

// One argument: a tag that names the type, and the value or a pointer to it.
// Records live for one call and own nothing; what they point at must outlive
// the call.
struct zxFmtArg {
  std::uint32_t tag;
  std::uintptr_t value;

  zxFmtArg(std::same_as<int> auto number)
      : tag('i'), value(static_cast<std::uintptr_t>(number)) {}
  zxFmtArg(std::same_as<char> auto byte)
      : tag('c'), value(static_cast<unsigned char>(byte)) {}
  zxFmtArg(const char* text)
      : tag('z'), value(reinterpret_cast<std::uintptr_t>(text)) {}
  // Exactly these types: what only converts to one would be a temporary,
  // gone by the time that the record is read.
  zxFmtArg(const std::derived_from<zxStr> auto& text)
      : tag('s'),
        value(reinterpret_cast<std::uintptr_t>(
            static_cast<const zxStr*>(&text))) {}
  zxFmtArg(const std::same_as<double> auto& number)
      : tag('f'), value(reinterpret_cast<std::uintptr_t>(&number)) {}
  zxFmtArg(const std::same_as<zxDate> auto& date)
      : tag('t'), value(reinterpret_cast<std::uintptr_t>(&date)) {}
};

// Composes into `out`, whose old text is dropped.  False on a bad format:
// `out` then holds the text so far and the rest of the format, from the
// directive that failed; left-over arguments give the complete text.
bool sfmt_core(zxStr& out, const char* format, std::int32_t count,
               const zxFmtArg* args);

// Appends a double's default form: up to 15 significant digits without
// trailing zeros, a tie away from zero; below 0.0001 and from 1e15 on with
// an exponent of at least three digits; "inf", "-inf", "nan".  No locale.
void append_number(zxStr& out, double number);

namespace zxsfmt_detail {

inline constexpr std::size_t k_max_args = 15;

// The failures of the entries that give a text, and of those that write.
void fail_with_position();
void fail();
void bail_text(const zxStr& text);

template <class... Args>
bool compose(zxStr& out, const char* format, const Args&... args) {
  const std::array<zxFmtArg, sizeof...(Args)> list{zxFmtArg(args)...};
  return sfmt_core(out, format, static_cast<std::int32_t>(list.size()),
                   list.data());
}

}  // namespace zxsfmt_detail

// The composed text; a bad format is message 2006 with the position that
// ZX_HERE stored, and, should that be dropped, the text so far.
template <class... Args>
zxStr sfmt(const char* format, const Args&... args) {
  static_assert(sizeof...(Args) <= zxsfmt_detail::k_max_args);
  zxStr text;
  if (!zxsfmt_detail::compose(text, format, args...))
    zxsfmt_detail::fail_with_position();
  return text;
}

// Writes the text to a file, counting a line; no line end is added.  A bad
// format is message 2006, and nothing is written.
template <class... Args>
void fprint(zxBFile& file, const char* format, const Args&... args) {
  static_assert(sizeof...(Args) <= zxsfmt_detail::k_max_args);
  zxStr text;
  if (zxsfmt_detail::compose(text, format, args...))
    file.puts(text);
  else
    zxsfmt_detail::fail();
}

// Writes the text to standard output or to standard error.
template <class... Args>
void oprint(const char* format, const Args&... args) {
  fprint(g_stdout, format, args...);
}
template <class... Args>
void eprint(const char* format, const Args&... args) {
  fprint(g_stderr, format, args...);
}

// Ends the process with the text as a message without a number.
template <class... Args>
void bailf(const char* format, const Args&... args) {
  static_assert(sizeof...(Args) <= zxsfmt_detail::k_max_args + 1);
  zxStr text;
  if (zxsfmt_detail::compose(text, format, args...))
    zxsfmt_detail::bail_text(text);
  else
    zxsfmt_detail::fail();
}

#endif  // ZXSFMT_H
