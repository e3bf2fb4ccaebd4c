// format_run.h - what the tests of the format language share: composing with
// an outcome that can be compared, the clock, the zone, lists of arguments.
#ifndef TESTS_ZXLIB_FORMAT_RUN_H
#define TESTS_ZXLIB_FORMAT_RUN_H

#include <array>
#include <cstdint>
#include <ostream>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/failure.h"
#include "kit/text.h"
#include "kit/ticks.h"
#include "kit/variables.h"
#include "zxplat.h"
#include "zxsfmt.h"

namespace format_run {

// What the core makes of a format and its arguments.
struct Composed {
  bool good;
  std::string text;

  friend bool operator==(const Composed&, const Composed&) = default;
};

inline std::ostream& operator<<(std::ostream& out, const Composed& composed) {
  return out << (composed.good ? "good '" : "bad '") << composed.text << "'";
}

inline Composed good(std::string text) { return {true, std::move(text)}; }
inline Composed bad(std::string text) { return {false, std::move(text)}; }

inline Composed compose_list(zxFmtEnv& env, const char* format,
                             const zxFmtArg* args, std::size_t count) {
  zxStr out = "to be dropped";
  const bool is_good =
      sfmt_core(out, format, env, static_cast<std::int32_t>(count), args);
  return {is_good, kit::text_of(out)};
}

template <class... Args>
Composed compose_in(zxFmtEnv& env, const char* format, const Args&... args) {
  const std::array<zxFmtArg, sizeof...(Args)> list{zxFmtArg(args)...};
  return compose_list(env, format, list.data(), list.size());
}

template <class... Args>
Composed compose(const char* format, const Args&... args) {
  zxFmtEnv env;
  return compose_in(env, format, args...);
}

// That a statement fails an assertion of this module, whichever of its files
// that stands in.
#define EXPECT_SFMT_ASSERTION(statement)                          \
  EXPECT_TRUE(kit::failure_of([&] {                               \
                static_cast<void>(statement);                     \
              }).message.starts_with("1000: bailed out: zxsfmt")) \
      << #statement

using kit::Clock;
using kit::InZone;
using kit::Variable;

// ---- lists of arguments

using List = std::vector<zxFmtArg>;

inline zxFmtArg list_of(List& list) { return {zxFmtArg::k_list, &list}; }

// A record of a boolean, which is an element of a list only.
inline zxFmtArg boolean(bool value) {
  zxFmtArg arg(value ? 1 : 0);
  arg.tag = zxFmtArg::k_bool;
  return arg;
}

// A record of the void element of a list.
inline zxFmtArg nothing() { return {zxFmtArg::k_void, nullptr}; }

// While one lives, arguments of the list tag are Lists.
class Lists {
 public:
  Lists() { zx_fmt_take_from_list = take; }
  Lists(const Lists&) = delete;
  Lists& operator=(const Lists&) = delete;
  ~Lists() { zx_fmt_take_from_list = before; }

 private:
  static bool take(void* place, zxFmtArg& element, bool& is_last) {
    List& list = *static_cast<List*>(place);
    if (list.empty()) return false;
    element = list.front();
    list.erase(list.begin());
    is_last = list.empty();
    return true;
  }

  zxTakeFromList before = zx_fmt_take_from_list;
};

// What escapes tell of the program, for as long as one lives.
class Program {
 public:
  explicit Program(const zxFmtProgram& program) { zx_fmt_program = program; }
  Program(const Program&) = delete;
  Program& operator=(const Program&) = delete;
  ~Program() { zx_fmt_program = before; }

 private:
  zxFmtProgram before = zx_fmt_program;
};

}  // namespace format_run

#endif  // TESTS_ZXLIB_FORMAT_RUN_H
