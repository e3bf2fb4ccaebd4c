// zxregexe_stack_impl.h - the stack of choices that a run of the matcher may
// have to go back to, and of the values that it puts back then.  Not
// installed.
#ifndef ZXREGEXE_STACK_IMPL_H
#define ZXREGEXE_STACK_IMPL_H

#include <algorithm>
#include <cstddef>
#include <cstdint>

#include "zxatsys.h"
#include "zxmisc.h"

namespace zxregexe {

enum class FrameKind : std::uint8_t {
  alternative,  // step: the BRANCH to try next; place: where
  greedy,       // step: the repetition; count: to try next; place: its begin
  lazy,
  group_start,  // count: the group; place: its old start
  group_end,    // ... its old end
  field_start,  // step: the field; count: its old type; place: its old start
  field_end,    // place: its old end
  failing,      // step and place: what has failed when all above has;
                // count: the counts touched before it
};

struct Frame {
  FrameKind kind;
  std::uint8_t current;  // the current group to go on with
  std::uint16_t step;
  std::uint32_t count;
  const char* place;
};
static_assert(sizeof(Frame) == 8 + sizeof(void*));

// Kept between runs; what is beyond `k_kept` frames is given back.
struct Stack {
  static constexpr std::size_t k_kept = 65536 / sizeof(Frame);
  Frame* bottom = nullptr;
  Frame* limit = nullptr;

  std::size_t capacity() const {
    return static_cast<std::size_t>(limit - bottom);
  }

  bool resize(std::size_t frames) {
    auto* block =
        static_cast<Frame*>(zx_realloc(bottom, frames * sizeof(Frame)));
    if (block == nullptr && frames != 0) return false;
    bottom = block;
    limit = block + frames;
    return true;
  }

  // Makes room for more frames; the place of `top` in the block that has
  // moved, or null.
  [[gnu::noinline]] Frame* grow(const Frame* top) {
    const auto used = static_cast<std::size_t>(top - bottom);
    const std::size_t wanted = std::max(k_kept, 2 * capacity());
    if (wanted > PTRDIFF_MAX / sizeof(Frame)) {
      bail_code(2000);
      return nullptr;
    }
    return resize(wanted) ? bottom + used : nullptr;
  }
};
inline constinit Stack stack;

}  // namespace zxregexe

#endif  // ZXREGEXE_STACK_IMPL_H
