// patterns_test.cpp - the inputs that fuzzing the pattern engine has kept,
// run again; fuzz/patterns.cpp says what each must not do.

#include "corpus.h"

namespace {

TEST(patterns, each_input_of_the_corpus_comes_back) {
  replay("patterns", fuzz::patterns, 60);
}

TEST(patterns, inputs_without_all_their_parts_come_back) {
  feed_starts(fuzz::patterns, "7 (a+)b\n\n`1\n\nxaab");
}

}  // namespace
