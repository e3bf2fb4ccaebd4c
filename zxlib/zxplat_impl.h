// zxplat_impl.h - private to zxplat*.cpp: what both targets have in common.
#ifndef ZXPLAT_IMPL_H
#define ZXPLAT_IMPL_H

#include <cstdint>
#include <string_view>

#include "zxplat.h"

namespace zxplat::common {

// Where boxes go that are not to be shown: adds the text to the place that
// the environment variable ZX_BOX_OUT names.  False if it names none.
bool divert_box(std::string_view text);

// The same for the debugger's texts and ZX_DEBUG_OUT.
bool divert_debug_output(std::string_view text);

// The caption, the style and the text, each with a line feed behind it, as
// they go to such a place.
class BoxText {
 public:
  BoxText(const char* text, const char* caption, std::uint32_t style);
  std::string_view view() const { return {room, used}; }

 private:
  void add(std::string_view piece);

  char room[20480];
  std::size_t used = 0;
};

// True for the two entries that every folder has.
inline bool is_dots(std::string_view name) {
  return name == "." || name == "..";
}

// True if the local clock can show a moment.
inline bool has_fields(std::int64_t moment) {
  return moment >= 0 && moment <= k_last_moment;
}

// Writes all bytes to standard error, if it takes them.
void write_to_standard_error(std::string_view text);

}  // namespace zxplat::common

#endif  // ZXPLAT_IMPL_H
