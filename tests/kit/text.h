// text.h - strings of the library as those that tests compare; all texts over
// an alphabet.
#ifndef TESTS_KIT_TEXT_H
#define TESTS_KIT_TEXT_H

#include <functional>
#include <string>
#include <string_view>

#include "zxstr.h"

namespace kit {

inline std::string text_of(const zxStr& text) {
  return std::string(text.view());
}

inline zxStr str(std::string_view text) { return zxStr(text); }

// Calls for all texts over an alphabet up to a length, each followed by those
// that continue it.
inline void for_all_texts(std::string_view alphabet, std::size_t longest,
                          const std::function<void(const std::string&)>& call,
                          const std::string& start = "") {
  call(start);
  if (start.size() == longest) return;
  for (const char byte : alphabet)
    for_all_texts(alphabet, longest, call, start + byte);
}

}  // namespace kit

#endif  // TESTS_KIT_TEXT_H
