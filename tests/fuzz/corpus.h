// corpus.h - running a fuzz target with the inputs that stand in its corpus.
#ifndef TESTS_FUZZ_CORPUS_H
#define TESTS_FUZZ_CORPUS_H

#include <gtest/gtest.h>

#include <string>

#include "fuzz/targets.h"
#include "kit/pages.h"
#include "kit/tempdir.h"

using FuzzTarget = void (*)(fuzz::Bytes input);

inline void feed(FuzzTarget target, const std::string& text) {
  target({reinterpret_cast<const std::uint8_t*>(text.data()), text.size()});
}

// Each input comes back, and there are at least so many.
inline void replay(const char* name, FuzzTarget target, std::size_t least) {
  const std::string folder = kit::source(std::string("fuzz/corpus/") + name);
  const auto inputs = kit::names_in(folder);
  EXPECT_GE(inputs.size(), least);
  for (const std::string& input : inputs) {
    SCOPED_TRACE(input);
    feed(target, kit::read_file(folder + "/" + input));
  }
}

// So does each start of an input.
inline void feed_starts(FuzzTarget target, const std::string& whole) {
  for (std::size_t n = 0; n <= whole.size(); ++n)
    feed(target, whole.substr(0, n));
}

#endif  // TESTS_FUZZ_CORPUS_H
