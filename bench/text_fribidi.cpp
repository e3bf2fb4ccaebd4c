// text_fribidi.cpp - FriBidi as a side of Hebrew lines: code page 862 to its
// characters of 32 bits by a table, reordering, and to UTF-8 by its own
// conversion.  Reordering what was reordered gives the first order back.
#ifdef BENCH_WITH_FRIBIDI

#include <fribidi.h>

#include <array>
#include <cstdlib>

#include "text.h"

namespace text {
namespace {

constexpr auto k_characters = [] {
  std::array<FriBidiChar, 256> characters{};
  for (FriBidiChar byte = 0; byte < 256; ++byte)
    characters[byte] = byte < 128 ? byte : byte - 128 + 0x5D0;
  return characters;
}();

struct Line {
  explicit Line(const std::string& text)
      : size(static_cast<FriBidiStrIndex>(text.size())) {
    FriBidiChar* out = characters;
    for (const char byte : text)
      *out++ = k_characters[static_cast<unsigned char>(byte)];
  }

  std::string in_utf8() const {
    char room[6 * 60 + 1];
    const FriBidiStrIndex length = fribidi_unicode_to_charset(
        FRIBIDI_CHAR_SET_UTF8, characters, size, room);
    return std::string(room, static_cast<std::size_t>(length));
  }

  FriBidiChar characters[60];
  FriBidiStrIndex size;
};

// The steps that fribidi_log2vis() takes, without its blocks of the heap and
// the joining of Arabic letters.
std::string by_steps(std::size_t i) {
  Line line(lines()[i]);
  FriBidiCharType types[60];
  FriBidiBracketType brackets[60];
  FriBidiLevel levels[60];
  FriBidiParType base = FRIBIDI_PAR_RTL;
  fribidi_get_bidi_types(line.characters, line.size, types);
  fribidi_get_bracket_types(line.characters, line.size, types, brackets);
  if (fribidi_get_par_embedding_levels_ex(types, brackets, line.size, &base,
                                          levels) == 0)
    std::abort();
  fribidi_shape_mirroring(levels, line.size, line.characters);
  if (fribidi_reorder_line(FRIBIDI_FLAGS_DEFAULT, types, line.size, 0, base,
                           levels, line.characters, nullptr) == 0)
    std::abort();
  return line.in_utf8();
}

std::string by_log2vis(std::size_t i) {
  const Line line(lines()[i]);
  Line result = line;
  FriBidiParType base = FRIBIDI_PAR_RTL;
  if (fribidi_log2vis(line.characters, line.size, &base, result.characters,
                      nullptr, nullptr, nullptr) == 0)
    std::abort();
  return result.in_utf8();
}

}  // namespace

void add_fribidi() {
  add<by_steps>("hebrew", "fribidi");
  add<by_log2vis>("hebrew", "log2vis");
}

}  // namespace text

#endif  // BENCH_WITH_FRIBIDI
