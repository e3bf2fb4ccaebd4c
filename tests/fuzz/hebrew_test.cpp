// hebrew_test.cpp - the inputs that fuzzing Hebrew reordering has kept, run
// again; fuzz/hebrew.cpp says what each must not do.

#include "corpus.h"

namespace {

TEST(hebrew, each_input_of_the_corpus_comes_back) {
  replay("hebrew", fuzz::hebrew, 30);
}

TEST(hebrew, each_start_of_a_line_comes_back) {
  feed_starts(fuzz::hebrew,
              ".\x83\x82\x81 abc (12.5%)\r\n$12,345 \x85\xFE 7\xFD q");
}

}  // namespace
