// unescape_test.cpp - the inputs that fuzzing the reading of strings has kept,
// run again; fuzz/unescape.cpp says what each must not do.

#include "corpus.h"

namespace {

TEST(unescape, each_input_of_the_corpus_comes_back) {
  replay("unescape", fuzz::unescape, 30);
}

TEST(unescape, each_start_of_a_text_comes_back) {
  for (const char* text : {"\x02\\x\\x41\\q\\", "\x01,-12,345.67e-8",
                           "\x03"
                           "abcxxABCabc",
                           "\x01k 2147483K"})
    feed_starts(fuzz::unescape, text);
}

}  // namespace
