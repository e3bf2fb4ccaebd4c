// text.h - strings of the library as those that tests compare.
#ifndef TESTS_KIT_TEXT_H
#define TESTS_KIT_TEXT_H

#include <string>
#include <string_view>

#include "zxstr.h"

namespace kit {

inline std::string text_of(const zxStr& text) {
  return std::string(text.view());
}

inline zxStr str(std::string_view text) { return zxStr(text); }

}  // namespace kit

#endif  // TESTS_KIT_TEXT_H
