// require.cpp - how a fuzz target ends the process.
#include <cstdio>
#include <cstdlib>

#include "fuzz/targets.h"

namespace fuzz {

void require(bool holds, const char* what) {
  if (holds) return;
  std::fprintf(stderr, "fuzz: %s\n", what);
  std::abort();
}

}  // namespace fuzz
