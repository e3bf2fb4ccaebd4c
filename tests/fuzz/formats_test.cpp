// formats_test.cpp - the inputs that fuzzing the format language has kept, run
// again; fuzz/formats.cpp says what each must not do.

#include "corpus.h"

namespace {

using namespace std::string_literals;

TEST(formats, each_input_of_the_corpus_comes_back) {
  replay("formats", fuzz::formats, 50);
}

TEST(formats, inputs_without_all_their_parts_come_back) {
  // Two numbers and a text; a list of them.
  const std::string arguments = "\0\x07\0\0\x09\0\x06\x02"s;
  const std::string format = "# %5d %-*s $r-3 ${a";
  feed_starts(fuzz::formats, "\x03" + arguments + format);
  feed_starts(fuzz::formats, "\x13" + arguments + format);
}

}  // namespace
