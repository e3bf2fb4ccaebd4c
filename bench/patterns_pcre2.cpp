// patterns_pcre2.cpp - PCRE2 for bytes, its interpreter and its just-in-time
// compiler, as sides of bench_patterns.
#ifdef BENCH_WITH_PCRE2

#define PCRE2_CODE_UNIT_WIDTH 8
#include <pcre2.h>

#include "patterns_side.h"
#include "patterns_sides.h"

namespace patterns {
namespace {

const PCRE2_UCHAR* bytes_of(const char* text) {
  return reinterpret_cast<const PCRE2_UCHAR*>(text);
}

pcre2_code* compiled(const Pattern& pattern) {
  int error = 0;
  PCRE2_SIZE place = 0;
  return pcre2_compile(bytes_of(pattern.theirs), PCRE2_ZERO_TERMINATED,
                       PCRE2_DOTALL | PCRE2_DOLLAR_ENDONLY, &error, &place,
                       nullptr);
}

// What compiled code uses instead of the machine's stack, whose part of 32 KB
// is too small for long subjects.
pcre2_match_context* with_large_stack() {
  constexpr std::size_t k_first = 32 * 1024;
  constexpr std::size_t k_most = std::size_t{1} << 29;
  static pcre2_match_context* const context = [] {
    pcre2_match_context* const made = pcre2_match_context_create(nullptr);
    pcre2_jit_stack_assign(made, nullptr,
                           pcre2_jit_stack_create(k_first, k_most, nullptr));
    return made;
  }();
  return context;
}

// The memory for results is made with the first search: who only compiles
// needs none.
template <bool jit>
class Regex {
 public:
  explicit Regex(const Pattern& pattern)
      : groups(pattern.groups), code(compiled(pattern)) {
    if constexpr (jit) pcre2_jit_compile(code, PCRE2_JIT_COMPLETE);
  }
  Regex(const Regex&) = delete;
  Regex& operator=(const Regex&) = delete;
  ~Regex() {
    pcre2_match_data_free(data);
    pcre2_code_free(code);
  }

  bool search(std::string_view subject) {
    if (data == nullptr)
      data = pcre2_match_data_create_from_pattern(code, nullptr);
    constexpr auto run = jit ? pcre2_jit_match : pcre2_match;
    return run(code, bytes_of(subject.data()), subject.size(), 0, 0, data,
               context) > 0;
  }

  std::size_t lengths() const {
    const PCRE2_SIZE* const places = pcre2_get_ovector_pointer(data);
    PCRE2_SIZE sum = 0;
    for (int n = 0; n <= groups; ++n) sum += places[2 * n + 1] - places[2 * n];
    return sum;
  }

  Span span(int n) const {
    const PCRE2_SIZE* const places = pcre2_get_ovector_pointer(data) + 2 * n;
    if (places[0] == PCRE2_UNSET) return {-1, -1};
    return {static_cast<std::ptrdiff_t>(places[0]),
            static_cast<std::ptrdiff_t>(places[1])};
  }

  const pcre2_code* program() const { return code; }

 private:
  const int groups;
  pcre2_code* const code;
  pcre2_match_data* data = nullptr;
  pcre2_match_context* const context = jit ? with_large_stack() : nullptr;
};

// The result has room for all that comes.
template <bool jit>
class Replacer {
 public:
  explicit Replacer(const Replacement& wanted)
      : replacement(wanted),
        regex(wanted.pattern),
        subject(wanted.subject()),
        text(2 * subject.size(), '\0'),
        data(pcre2_match_data_create_from_pattern(regex.program(), nullptr)) {}
  Replacer(const Replacer&) = delete;
  Replacer& operator=(const Replacer&) = delete;
  ~Replacer() { pcre2_match_data_free(data); }

  std::size_t run() {
    length = text.size();
    pcre2_substitute(regex.program(), bytes_of(subject.data()), subject.size(),
                     0, PCRE2_SUBSTITUTE_GLOBAL, data, nullptr,
                     bytes_of(replacement.dollars), PCRE2_ZERO_TERMINATED,
                     reinterpret_cast<PCRE2_UCHAR*>(text.data()), &length);
    return length;
  }

  std::string_view result() const {
    return std::string_view(text).substr(0, length);
  }

 private:
  const Replacement& replacement;
  const Regex<jit> regex;
  const std::string& subject;
  std::string text;
  pcre2_match_data* const data;
  PCRE2_SIZE length = 0;
};

}  // namespace

void add_pcre2() {
  add_side<Regex<false>, Replacer<false>>("pcre2");
  add_side<Regex<true>, Replacer<true>>("jit");
}

}  // namespace patterns

#endif  // BENCH_WITH_PCRE2
