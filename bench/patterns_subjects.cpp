// patterns_subjects.cpp - the short patterns of bench_patterns: what options,
// configuration, log control and tokenising match, with subjects like theirs.
//
// Subjects are put together at random, the same in each run; about one in
// four does not match.
#include <algorithm>
#include <array>
#include <numeric>
#include <random>

#include "patterns.h"

namespace patterns {
namespace {

constexpr std::size_t k_longest = 100;

// ---- parts of subjects

class Random {
 public:
  explicit Random(std::uint32_t seed) : next(seed) {}

  std::size_t below(std::size_t n) { return next() % n; }
  std::size_t between(std::size_t a, std::size_t b) {
    return a + below(b - a + 1);
  }
  bool once_in(std::size_t n) { return below(n) == 0; }

  template <std::size_t n>
  const char* one_of(const std::array<const char*, n>& texts) {
    return texts[below(n)];
  }

  std::string bytes_of(std::string_view alphabet, std::size_t n) {
    std::string text;
    for (std::size_t i = 0; i < n; ++i)
      text += alphabet[below(alphabet.size())];
    return text;
  }
  std::string digits(std::size_t n) { return bytes_of("0123456789", n); }
  std::string letters(std::size_t n) {
    return bytes_of("abcdefghijklmnopqrstuvwxyz", n);
  }
  std::string blanks(std::size_t most) {
    return bytes_of("  \t", between(0, most));
  }

  // Words of small letters with a blank between them.
  std::string words(std::size_t n) {
    std::string text = letters(between(2, 9));
    for (std::size_t i = 1; i < n; ++i) text += ' ' + letters(between(2, 9));
    return text;
  }

 private:
  std::mt19937 next;
};

constexpr std::array<const char*, 8> k_levels = {
    "DBG", "MSG", "INFO", "WARN", "ERR", "ALERT", "DIE", "NONE"};
constexpr std::array<const char*, 3> k_sinks = {"toscreen", "tofile",
                                                "todebugger"};
constexpr std::array<const char*, 4> k_numbers = {"12", "-7.50", "+123456.",
                                                  "3.1415926535"};

// ---- subjects: one that matches, unless it is not to

std::string section(Random& random, bool fits) {
  return "[" + random.words(random.between(2, 10)) + (fits ? "]" : "] ");
}

std::string item(Random& random, bool fits) {
  return random.letters(random.between(3, 12)) + random.blanks(3) +
         (fits ? "=" : ":") + random.blanks(3) +
         random.words(random.between(2, 8));
}

std::string declaration(Random& random, bool fits) {
  std::string text = random.letters(random.between(4, 10));
  if (random.once_in(2)) text += "|" + random.letters(5) + " (none)";
  text += fits ? " = " : " is ";
  if (random.once_in(3)) text += '!';
  text += random.once_in(2) ? "[a-z]+" + random.letters(8) : ".+";
  return text + random.blanks(2) + (random.once_in(2) ? "..." : "");
}

std::string in_parentheses(Random& random, bool fits) {
  return random.letters(random.between(4, 30)) + random.blanks(3) +
         (fits ? "(" : "") + random.words(random.between(1, 5)) + ")" +
         random.blanks(2);
}

std::string path(Random& random, bool fits) {
  std::string text = random.once_in(3) ? "" : "C:";
  for (std::size_t n = random.between(1, 7); n > 0; --n)
    text += "\\" + random.letters(random.between(3, 9));
  text += "-" + random.digits(4) + "_x.txt";
  if (!fits) text.insert(0, "?");
  return text;
}

std::string level(Random& random, bool fits) {
  return std::string(random.one_of(k_sinks)) + random.blanks(3) + "=" +
         random.blanks(3) + random.one_of(k_levels) +
         (fits ? "" : random.letters(3));
}

std::string log_line(Random& random, bool fits) {
  const auto two = [&] { return random.digits(2); };
  return two() + "/" + two() + "/" + two() + (fits ? " " : "  ") + two() + ":" +
         two() + ":" + two() + random.bytes_of(" *WE", 1).insert(0, " ") + " " +
         random.digits(4) + ": " + random.words(random.between(2, 7));
}

std::string option(Random& random, bool fits) {
  return (fits ? "-" : "") + random.letters(1) + "=" +
         random.letters(random.between(8, 60));
}

std::string option_type(Random& random, bool fits) {
  std::string text = "-" + random.letters(2);
  for (std::size_t n = random.between(1, 7); n > 0; --n)
    text += " --" + random.letters(random.between(4, 8));
  return text + " :" + random.bytes_of(fits ? "bsinvf" : "xyz", 1);
}

std::string option_value(Random& random, bool fits) {
  return "--" + random.letters(random.between(3, 20)) + "=" +
         random.one_of(k_numbers) + random.digits(random.between(4, 20)) +
         (fits ? "" : "%");
}

std::string number(Random& random, bool fits) {
  std::string text = (fits ? "" : "x") + random.digits(random.between(1, 8));
  if (random.once_in(2)) text += "." + random.digits(random.between(0, 4));
  if (random.once_in(2)) text += "e+" + random.digits(2);
  return text + " + (" + random.words(random.between(2, 10)) + ")";
}

std::string name(Random& random, bool fits) {
  return (fits ? "$" : "+") + random.letters(random.between(3, 12)) + "_" +
         random.digits(2) + " = " + random.words(random.between(1, 9)) + ";";
}

std::string quoted(Random& random, bool fits) {
  std::string text = "\"" + random.words(random.between(1, 5));
  if (random.once_in(2)) text += "\\\"" + random.words(1) + "\\n";
  return text + (fits ? "\"" : "") + ", " + random.words(random.between(1, 4));
}

// ---- the table

struct Row {
  const char* name;
  Pattern pattern;
  std::string (*subject)(Random& random, bool fits);
};

// A quoted text is one typed field for us; the peers get the loop that is the
// fastest for it.
constexpr std::array<Row, 13> k_rows = {{
    {"section", {"^`[(.*)`]$", R"(^\[(.*)\]$)", 1}, section},
    {"item", {"^(.*?)`s*=`s*(.*)$", R"(^(.*?)\s*=\s*(.*)$)", 2}, item},
    {"declaration",
     {"`s*=`s*(!)?(.*?)`s*(`.`.`.)?$", R"(\s*=\s*(!)?(.*?)\s*(\.\.\.)?$)", 3},
     declaration},
    {"in_parentheses",
     {"`s*`((.*?)`)`s*", R"(\s*\((.*?)\)\s*)", 1},
     in_parentheses},
    {"path",
     {"^(([A-Za-z]:)?[`w.`-_`\\]+)$", R"(^(([A-Za-z]:)?[0-9A-Za-z.\-_\\]+)$)",
      2},
     path},
    {"level",
     {"^(toscreen|tofile|todebugger)`s*=`s*"
      "(DBG|MSG|INFO|WARN|ERR|ALERT|DIE|NONE)$",
      R"(^(toscreen|tofile|todebugger)\s*=\s*)"
      "(DBG|MSG|INFO|WARN|ERR|ALERT|DIE|NONE)$",
      2},
     level},
    {"log_line",
     {"^(`d`d)/(`d`d)/(`d`d) (`d`d):(`d`d):(`d`d) (.) (`d{4}): (.*)$",
      R"(^(\d\d)/(\d\d)/(\d\d) (\d\d):(\d\d):(\d\d) (.) (\d{4}): (.*)$)", 9},
     log_line},
    {"option", {"^(-.)(.*)$", "^(-.)(.*)$", 2}, option},
    {"option_type", {":([bsinvf])", ":([bsinvf])", 1}, option_type},
    {"option_value",
     {"^--(`w+)=([+-]?`d+(`.`d*)?)$",
      R"(^--([0-9A-Za-z]+)=([+-]?\d+(\.\d*)?)$)", 3},
     option_value},
    {"number",
     {"^(`d+`.?`d*([eE][+-]?`d+)?)", R"(^(\d+\.?\d*([eE][+-]?\d+)?))", 2},
     number},
    {"name", {"^([A-Za-z_$][`w_]*)", "^([A-Za-z_$][0-9A-Za-z_]*)", 1}, name},
    {"quoted", {"^(%0C)", R"re(^("[^"\\]*(?:\\.[^"\\]*)*"))re", 1}, quoted},
}};

Short with_subjects(const Row& row) {
  Random random(4711);
  Short made{row.name, row.pattern, {}};
  while (made.subjects.size() < k_subjects) {
    std::string text = row.subject(random, made.subjects.size() % 4 != 3);
    text.resize(std::min(text.size(), k_longest));
    made.subjects.push_back(std::move(text));
  }
  return made;
}

}  // namespace

const std::vector<Short>& short_patterns() {
  static const std::vector<Short> all = [] {
    std::vector<Short> made;
    for (const Row& row : k_rows) made.push_back(with_subjects(row));
    return made;
  }();
  return all;
}

const std::vector<std::size_t>& visits() {
  constexpr int k_rounds = 64;
  static const std::vector<std::size_t> all = [] {
    std::mt19937 random(4712);
    std::vector<std::size_t> order;
    for (int n = 0; n < k_rounds; ++n) {
      std::vector<std::size_t> round(k_subjects);
      std::iota(round.begin(), round.end(), std::size_t{0});
      std::shuffle(round.begin(), round.end(), random);
      order.insert(order.end(), round.begin(), round.end());
    }
    return order;
  }();
  return all;
}

}  // namespace patterns
