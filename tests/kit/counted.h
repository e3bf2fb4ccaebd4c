// counted.h - the test kit: an element type that tells how many of its
// objects live, for tests of containers.
#ifndef KIT_COUNTED_H
#define KIT_COUNTED_H

#include "zxmisc.h"

namespace kit {

// Counts its living objects, those of each test file apart: `Owner` is some
// type of that file.  The bytes may be moved.
template <class Owner>
struct Counted {
  int number = 77;

  Counted() { ++alive; }
  explicit Counted(int n) : number(n) { ++alive; }
  Counted(const Counted& other) : number(other.number) { ++alive; }
  Counted& operator=(const Counted& other) = default;
  ~Counted() {
    number = -1;
    --alive;
  }
  inline static int alive = 0;
};

}  // namespace kit

template <class Owner>
inline constexpr bool zx_relocatable<kit::Counted<Owner>> = true;

#endif  // KIT_COUNTED_H
