// patterns_long.cpp - the long subjects of bench_patterns, those that take
// very long, and what is replaced.
#include <random>

#include "patterns.h"

namespace patterns {
namespace {

constexpr std::size_t k_size = 1'000'000;

// ---- texts, the same in each run

std::string letters(std::mt19937& random, std::size_t n) {
  std::string text;
  for (std::size_t i = 0; i < n; ++i)
    text += static_cast<char>('a' + random() % 26);
  return text;
}

// Words of 2 to 10 small letters with a blank between them.
std::string prose() {
  std::mt19937 random(1);
  std::string text;
  while (text.size() < k_size) text += letters(random, 2 + random() % 9) + ' ';
  text.resize(k_size);
  return text;
}

// Now and then the beginning of what is searched for; the whole is at the
// end.
const std::string& with_needle() {
  static const std::string text = [] {
    std::string made = prose();
    for (std::size_t place = 5000; place < made.size(); place += 50'000)
      made.replace(place, 7, "needle ");
    return made + "needle4711";
  }();
  return text;
}

// Runs of 1 to 8 blanks and tabs between the words and at the end.
const std::string& with_blanks() {
  static const std::string text = [] {
    std::mt19937 random(2);
    std::string made;
    while (made.size() < k_size) {
      made += letters(random, 2 + random() % 9);
      for (auto n = 1 + random() % 8; n > 0; --n)
        made += random() % 4 == 0 ? '\t' : ' ';
    }
    return made;
  }();
  return text;
}

const std::string& with_digit_at_end() {
  static const std::string text = prose() + "end7";
  return text;
}

const std::string& with_word_at_end() {
  static const std::string text = prose() + "denied by a rule";
  return text;
}

const std::string& a_and_b() {
  static const std::string text = [] {
    std::mt19937 random(3);
    std::string made;
    while (made.size() < k_size) made += random() % 2 == 0 ? 'a' : 'b';
    return made + 'c';
  }();
  return text;
}

const std::string& with_x_at_end() {
  static const std::string text = prose() + 'x';
  return text;
}

// Settings such as "price=4711".
const std::string& settings() {
  static const std::string text = [] {
    std::mt19937 random(4);
    std::string made;
    while (made.size() < k_size)
      made += letters(random, 3 + random() % 10) + '=' +
              std::to_string(random() % 1'000'000) + "; ";
    return made;
  }();
  return text;
}

const std::string& almost_a() {
  static const std::string text = std::string(24, 'a') + 'b';
  return text;
}

const std::string& no_digit() {
  static const std::string text = prose().substr(0, 60);
  return text;
}

}  // namespace

const std::vector<Search>& searches() {
  static const std::vector<Search> all = {
      {"needle", {"needle[0-9]+", "needle[0-9]+", 0}, with_needle},
      {"trim", {"`s+$", "\\s+$", 0}, with_blanks},
      {"class_run", {"[a-z]+[0-9]", "[a-z]+[0-9]", 0}, with_digit_at_end},
      {"words",
       {"(error|failure|denied|fatal)`s", "(error|failure|denied|fatal)\\s", 1},
       with_word_at_end},
      {"loop", {"{{a|b}}*c", "(?:a|b)*c", 0}, a_and_b},
      {"to_last", {"^.*x$", "^.*x$", 0}, with_x_at_end},
      {"ambiguous", {"^(a|aa)+$", "^(a|aa)+$", 1}, almost_a},
      {"three_stars", {"^(.*)(.*)(.*)`d", R"(^(.*)(.*)(.*)\d)", 3}, no_digit},
  };
  return all;
}

const std::vector<Replacement>& replacements() {
  static const std::vector<Replacement> all = {
      {"squeeze", {"`s`s+", R"(\s\s+)", 0}, with_blanks, " ", " "},
      {"swap",
       {"([a-z]+)=(`d+)", R"(([a-z]+)=(\d+))", 2},
       settings,
       "`2=`1",
       "$2=$1"},
  };
  return all;
}

}  // namespace patterns
