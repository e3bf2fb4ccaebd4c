// patterns_test.cpp - the inputs that fuzzing the pattern engine has kept,
// run again; fuzz/patterns.cpp says what each must not do.

#include <gtest/gtest.h>

#include <string>

#include "fuzz/targets.h"
#include "kit/pages.h"
#include "kit/tempdir.h"

namespace {

fuzz::Bytes bytes_of(const std::string& text) {
  return {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()};
}

TEST(patterns, the_corpus_is_there) {
  EXPECT_GE(kit::names_in(kit::source("fuzz/corpus/patterns")).size(), 60u);
}

TEST(patterns, each_input_of_the_corpus_comes_back) {
  const std::string folder = kit::source("fuzz/corpus/patterns");
  for (const std::string& name : kit::names_in(folder)) {
    SCOPED_TRACE(name);
    fuzz::patterns(bytes_of(kit::read_file(folder + "/" + name)));
  }
}

TEST(patterns, inputs_without_all_their_parts_come_back) {
  const std::string whole = "7 (a+)b\n\n`1\n\nxaab";
  for (std::size_t n = 0; n <= whole.size(); ++n)
    fuzz::patterns(bytes_of(whole.substr(0, n)));
}

}  // namespace
