// text_hebrew.cpp - Hebrew lines from display order to UTF-8, ours and the
// conversion of characters alone by iconv.  text_fribidi.cpp has the side that
// reorders.
#include <iconv.h>

#include <cstdio>
#include <cstdlib>
#include <random>

#include "text.h"
#include "zxp2l.h"

namespace text {
namespace {

// ---- lines

using Random = std::mt19937;

std::string word(Random& random, int first, unsigned letters, unsigned most) {
  std::string result(2 + random() % (most - 1), ' ');
  for (char& byte : result)
    byte = static_cast<char>(first + static_cast<int>(random() % letters));
  return result;
}

std::string hebrew_word(Random& random) { return word(random, 128, 27, 6); }

std::string formatted(const char* format, Random& random) {
  char room[32];
  std::snprintf(room, sizeof room, format, static_cast<int>(random() % 28 + 1),
                static_cast<int>(random() % 90 + 10),
                static_cast<int>(random() % 90 + 10));
  return room;
}

std::string item(Random& random) {
  switch (random() % 16) {
    case 0:
      return formatted("%d", random);
    case 1:
      return formatted("%d,%d0.%d", random);
    case 2:
      return formatted("%d/%d/%d", random);
    case 3:
      return formatted("%d.%d%%", random);
    case 4:
      return hebrew_word(random).insert(0, "(").append(")");
    case 5:
      // A number next to it would be another's part to FriBidi.
      return word(random, 'a', 26, 8).append(" ").append(hebrew_word(random));
    default:
      return hebrew_word(random);
  }
}

std::string line(Random& random) {
  const std::size_t size = 10 + random() % 51;
  std::string text = hebrew_word(random);
  while (text.size() < size) text.append(" ").append(item(random));
  text.resize(size);
  return text;
}

// ---- ours

const std::vector<zxStr>& our_lines() {
  static const auto list = ours(lines());
  return list;
}

zxStr by_two_conversions(std::size_t i) {
  return ansi_to_utf8(logical_from_phys_lines(our_lines()[i], true));
}

zxStr by_export(std::size_t i) {
  static constexpr zxLogicalExport k_whole("");
  char room[zxLogicalExport::room_for(60)];
  return zxStr(k_whole.convert(room, our_lines()[i].view()));
}

zxStr to_utf16(std::size_t i) { return dos_to_utf16(our_lines()[i]); }

// ---- iconv

class Converter {
 public:
  explicit Converter(const char* to) : handle(iconv_open(to, "CP862")) {}
  ~Converter() { iconv_close(handle); }
  Converter(const Converter&) = delete;
  Converter& operator=(const Converter&) = delete;

  std::string convert(const std::string& text) const {
    char room[128];
    char* in = const_cast<char*>(text.data());
    char* out = room;
    std::size_t in_left = text.size();
    std::size_t out_left = sizeof room;
    if (iconv(handle, &in, &in_left, &out, &out_left) != 0) std::abort();
    return std::string(room, out);
  }

 private:
  iconv_t handle;
};

std::string iconv_to_utf8(std::size_t i) {
  static const Converter converter("UTF-8");
  return converter.convert(lines()[i]);
}

std::string iconv_to_utf16(std::size_t i) {
  static const Converter converter("UTF-16LE");
  return converter.convert(lines()[i]);
}

}  // namespace

std::vector<std::string> make_lines() {
  Random random(5);
  std::vector<std::string> made;
  while (made.size() < k_inputs) made.push_back(line(random));
  return made;
}

void add_hebrew() {
  add<by_export>("hebrew", "ours");
  add<by_two_conversions>("hebrew", "two");
  add<iconv_to_utf8>("hebrew", "iconv", same_characters);
  add<to_utf16>("utf16", "ours");
  add<iconv_to_utf16>("utf16", "iconv");
}

}  // namespace text
