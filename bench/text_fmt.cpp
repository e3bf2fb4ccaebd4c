// text_fmt.cpp - {fmt} as a side of composing text, with formats that it reads
// at run time.
#ifdef BENCH_WITH_FMT

#include <fmt/format.h>

#include <locale>

#include "text.h"

namespace text {
namespace {

std::string text_int_text(std::size_t i) {
  return fmt::format(fmt::runtime("{} {} {}"), names()[i], ints()[i],
                     other_names()[i]);
}

std::string one_text(std::size_t i) {
  return fmt::format(fmt::runtime("{}"), names()[i]);
}

std::string int_text_double(std::size_t i) {
  return fmt::format(fmt::runtime("{} {} {}"), ints()[i], names()[i],
                     doubles()[i]);
}

std::string int_text_15_digits(std::size_t i) {
  return fmt::format(fmt::runtime("{} {} {:.15g}"), ints()[i], names()[i],
                     doubles()[i]);
}

std::string shortest_double(std::size_t i) {
  return fmt::format(fmt::runtime("{}"), doubles()[i]);
}

std::string fixed(std::size_t i) {
  return fmt::format(fmt::runtime("{:.2f}"), doubles()[i]);
}

struct Thousands : std::numpunct<char> {
  char do_thousands_sep() const override { return ','; }
  std::string do_grouping() const override { return "\3"; }
};

std::string with_thousands(std::size_t i) {
  static const std::locale locale(std::locale::classic(), new Thousands);
  return fmt::format(locale, fmt::runtime("{:.2Lf}"), doubles()[i]);
}

}  // namespace

void add_fmt() {
  add<text_int_text>("text_int_text", "fmt");
  add<one_text>("one_text", "fmt");
  add<int_text_double>("int_text_double", "fmt");
  add<int_text_15_digits>("int_text_double", "fmt15");
  add<shortest_double>("double", "fmt");
  add<fixed>("fixed", "fmt", same_but_for_a_tie);
  add<with_thousands>("picture", "fmt", same_but_for_a_tie);
}

}  // namespace text

#endif  // BENCH_WITH_FMT
