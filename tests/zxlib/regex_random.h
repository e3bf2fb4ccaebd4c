// regex_random.h - random patterns of the dialect for the tests, and subjects
// that such patterns have a chance to match.  The same seed gives the same.
#ifndef REGEX_RANDOM_H
#define REGEX_RANDOM_H

#include <algorithm>
#include <cstdint>
#include <map>
#include <random>
#include <string>
#include <string_view>

#include "regex_tree.h"

namespace regex_model {

using namespace std::string_view_literals;

class Random {
 public:
  explicit Random(unsigned seed) : engine_(seed) {}

  // 0 to limit - 1.
  int below(int limit) {
    return static_cast<int>(engine_() % static_cast<unsigned>(limit));
  }
  int between(int low, int high) { return low + below(high - low + 1); }
  bool percent(int chance) { return below(100) < chance; }
  char byte() { return static_cast<char>(below(256)); }
  char of(std::string_view bytes) {
    return bytes[static_cast<std::size_t>(
        below(static_cast<int>(bytes.size())))];
  }
  template <std::size_t N>
  std::string_view pick(const std::string_view (&choices)[N]) {
    return choices[below(static_cast<int>(N))];
  }

 private:
  std::mt19937 engine_;
};

// What patterns are made of.
struct Flavour {
  std::string_view literals;  // bytes, of patterns and of subjects
  int depth = 3;              // of groups
  int pieces = 4;             // of a sequence, at most
  int alternatives = 3;       // of a group, at most
  int quantified = 40;        // percent of the pieces
  // How often each kind of atom comes, against each other.
  int literal = 10;
  int byte_class = 2;
  int class_letter = 2;
  int any = 1;
  int group = 6;
  int plain_group = 4;
  int anchor = 1;
  int boundary = 1;
  int back_reference = 1;
  int field = 1;
};

// Everything that the dialect has.
inline constexpr Flavour k_all = {
    .literals = "abc019 -+.\"/x`[]{}()%\n\0\xff\x80\x9a\x9b\xe0\xfa"sv};
// Counters: groups in groups, alternatives and loops over two letters.
inline constexpr Flavour k_nested = {.literals = "ab"sv,
                                     .depth = 4,
                                     .quantified = 50,
                                     .literal = 12,
                                     .byte_class = 1,
                                     .class_letter = 0,
                                     .group = 8,
                                     .plain_group = 6,
                                     .anchor = 0,
                                     .boundary = 0,
                                     .back_reference = 0,
                                     .field = 0};
inline constexpr Flavour k_references = {.literals = "ab"sv,
                                         .byte_class = 0,
                                         .class_letter = 0,
                                         .group = 8,
                                         .boundary = 0,
                                         .back_reference = 6,
                                         .field = 0};
// Literals and simple repetitions, as patterns mostly are.
inline constexpr Flavour k_plain = {.literals = "abcdefgh"sv,
                                    .depth = 1,
                                    .pieces = 7,
                                    .alternatives = 2,
                                    .literal = 20,
                                    .byte_class = 4,
                                    .class_letter = 4,
                                    .any = 3,
                                    .group = 3,
                                    .plain_group = 1};
inline constexpr Flavour k_with_fields = {
    .literals = "ab \t0127+-.xh\"~'\\/:"sv,
    .depth = 2,
    .quantified = 20,
    .literal = 6,
    .group = 2,
    .plain_group = 2,
    .field = 12};
inline constexpr Flavour k_letters = {
    .literals = "ab1_ \t\x80\x9a\x9b\xdf\xe0\xfa\xfb"sv,
    .depth = 2,
    .byte_class = 10,
    .class_letter = 10,
    .any = 2,
    .group = 2,
    .plain_group = 1,
    .boundary = 8,
    .field = 0};

// ---- patterns

// Writes patterns that are valid but for a few.
class PatternWriter {
 public:
  PatternWriter(Random& random, const Flavour& flavour)
      : random_(random), flavour_(flavour) {}

  std::string pattern() {
    groups_ = fields_ = 0;
    std::string text = choice(flavour_.depth).text;
    if (random_.percent(5)) text.insert(0, random_.pick({".*", ".*?", ".+"}));
    if (random_.percent(15)) text = "^" + text;
    if (random_.percent(15)) text += "$";
    return text;
  }

 private:
  // A piece of a pattern: whether it is one byte, and can't match empty.
  struct Made {
    std::string text;
    bool is_byte = false;
    bool has_width = true;
  };

  Made choice(int depth) {
    Made made = sequence(depth);
    if (random_.percent(65)) return made;
    const int count = random_.between(1, flavour_.alternatives - 1);
    for (int i = 0; i < count; ++i) {
      const Made next = sequence(depth);
      made.text += "|" + next.text;
      made.has_width = made.has_width && next.has_width;
    }
    return made;
  }

  Made sequence(int depth) {
    Made made = {"", false, false};
    const int count =
        random_.percent(4) ? 0 : random_.between(1, flavour_.pieces);
    for (int i = 0; i < count; ++i) {
      const Made next = piece(depth);
      made.text += next.text;
      made.has_width = made.has_width || next.has_width;
    }
    return made;
  }

  Made piece(int depth) {
    if (depth <= 1 && random_.percent(1)) return long_literal();
    Made made = atom(depth);
    if (!random_.percent(flavour_.quantified)) return made;
    std::string_view quantifier;
    if (made.is_byte)
      quantifier = random_.pick({"*", "*", "+", "+", "?", "?", "*?", "+?",
                                 "{2}", "{1,2}", "{0,2}", "{2,}", "{0,}", "{0}",
                                 "{1,3}?", "{0,2}?", "{1,}?"});
    else if (made.has_width)
      quantifier = random_.pick({"*", "+", "?"});
    else
      quantifier = "?";
    made.text += quantifier;
    made.has_width = quantifier.starts_with("+") || quantifier.starts_with("{");
    made.is_byte = false;
    return made;
  }

  Made atom(int depth) {
    const Flavour& f = flavour_;
    const int groups = depth > 0 ? f.group : 0;
    const int plain_groups = depth > 0 ? f.plain_group : 0;
    int left = random_.below(f.literal + f.byte_class + f.class_letter + f.any +
                             groups + plain_groups + f.anchor + f.boundary +
                             f.back_reference + f.field);
    const auto is = [&left](int weight) {
      left -= weight;
      return left < 0;
    };
    if (is(f.literal)) return {literal(random_.of(f.literals)), true, true};
    if (is(f.byte_class)) return {byte_class(), true, true};
    if (is(f.class_letter))
      return {std::string("`") + random_.of("aAdDhHsSwW"), true, true};
    if (is(f.any)) return {".", true, true};
    if (is(groups)) return group(depth);
    if (is(plain_groups)) {
      Made body = choice(depth - 1);
      return {"{{" + body.text + "}}", false, body.has_width};
    }
    if (is(f.anchor)) return {{random_.of("^$")}, false, false};
    if (is(f.boundary)) return {{'`', random_.of("bB")}, false, false};
    if (is(f.back_reference))
      return {{'`', static_cast<char>('1' + random_.below(groups_ + 1) % 9)},
              false,
              false};
    return field();
  }

  Made group(int depth) {
    // A few patterns have too many groups.
    if (groups_ >= k_max_groups && !random_.percent(10))
      return {"a", true, true};
    ++groups_;
    const Made body = choice(depth - 1);
    return {"(" + body.text + ")", false, body.has_width};
  }

  // A run that no one node can hold.
  Made long_literal() {
    Made made;
    const int length = random_.between(120, 300);
    for (int i = 0; i < length; ++i) made.text += random_.of("aaab");
    return made;
  }

  // A byte as a literal, escaped where it must be and sometimes elsewhere.
  std::string literal(char c) {
    constexpr std::string_view k_special = "^$.[()|?+*\\`{}%";
    if (random_.percent(3)) return octal(c);
    if (k_special.find(c) == k_special.npos) return {c};
    return {random_.of("`\\"), c};
  }

  static std::string octal(char c) {
    const auto value = static_cast<unsigned char>(c);
    return {'`', static_cast<char>('0' + value / 64),
            static_cast<char>('0' + value / 8 % 8),
            static_cast<char>('0' + value % 8)};
  }

  std::string byte_class() {
    std::string text = random_.percent(35) ? "[^" : "[";
    if (random_.percent(8)) text += random_.of("]-");
    const int count = random_.between(1, 3);
    for (int i = 0; i < count; ++i) text += class_member();
    if (random_.percent(5)) text += '-';
    return text + "]";
  }

  std::string class_member() {
    if (random_.percent(15)) return std::string("`") + random_.of("aAdDhHsSwW");
    char low = random_.of(flavour_.literals);
    if (random_.percent(10)) low = random_.byte();
    if (!random_.percent(30)) return class_byte(low);
    char high = random_.of(flavour_.literals);
    if (index_of(high) < index_of(low)) std::swap(low, high);
    return class_byte(low) + "-" + class_byte(high);
  }

  std::string class_byte(char c) {
    if (c == '\n' && random_.percent(50)) return "`n";
    if (c == '\0' && random_.percent(50)) return octal(c);
    constexpr std::string_view k_special = "]-`\\^";
    if (k_special.find(c) != k_special.npos || random_.percent(5))
      return octal(c);
    return {c};
  }

  Made field() {
    if (fields_ >= k_max_fields) return {"a", true, true};
    ++fields_;
    std::string text = "%";
    const char type = random_.of("ddxxfvsstCC");
    while (random_.percent(35)) text += random_.of("0*  +-=_"sv);
    const bool is_as_written = text.find('_') != text.npos;
    const bool is_width = !is_as_written && random_.percent(35);
    if (is_width) text += static_cast<char>('1' + random_.below(6));
    if (random_.percent(8)) text += ".2";
    if (type == 's')
      std::erase_if(text, [](char c) { return c == '+' || c == '='; });
    const bool has_width =
        is_as_written || is_width || text.find(' ') == text.npos;
    return {text + type, false, has_width};
  }

  Random& random_;
  const Flavour& flavour_;
  int groups_ = 0;
  int fields_ = 0;
};

// ---- damage

// Text with a few bytes changed, left out, put in or doubled.
inline std::string mutated(Random& random, std::string text, int times,
                           std::string_view bytes) {
  for (int i = 0; i < times; ++i) {
    const auto at = static_cast<std::size_t>(
        random.below(static_cast<int>(text.size()) + 1));
    const int what = random.below(4);
    if (what == 0 || text.empty()) text.insert(at, 1, random.of(bytes));
    if (at >= text.size()) continue;
    if (what == 1) text[at] = random.of(bytes);
    if (what == 2) text.erase(at, 1);
    if (what == 3) {
      const auto length = static_cast<std::size_t>(random.between(1, 3));
      text.insert(at, text.substr(at, length));
    }
  }
  return text;
}

inline std::string noise(Random& random, int length, std::string_view bytes) {
  std::string text;
  for (int i = 0; i < length; ++i) text += random.of(bytes);
  return text;
}

// ---- subjects

// Walks through the tree of a pattern and writes what it may match.
class SubjectWriter {
 public:
  SubjectWriter(Random& random, std::string_view literals)
      : random_(random), literals_(literals) {}

  // How often a repetition goes round at most.
  void repeat_at_most(int passes) { passes_ = passes; }

  std::string subject(const Node& pattern) {
    text_.clear();
    groups_.clear();
    walk(pattern);
    return text_;
  }

 private:
  static constexpr std::size_t k_longest = 400;

  void walk(const Node& node) {
    switch (node.kind) {
      case Kind::byte:
        text_ += byte_of(node.bytes);
        break;
      case Kind::back_reference:
        text_ += groups_[node.number];
        break;
      case Kind::field:
        text_ += field(node.field);
        break;
      case Kind::sequence:
        for (const Tree& part : node.parts) walk(*part);
        break;
      case Kind::choice:
        walk(*node.parts[static_cast<std::size_t>(
            random_.below(static_cast<int>(node.parts.size())))]);
        break;
      case Kind::group: {
        const std::size_t start = text_.size();
        walk(*node.parts[0]);
        groups_[node.number] = text_.substr(start);
        break;
      }
      case Kind::optional:
        again(node, 0, 1);
        break;
      case Kind::star:
        again(node, 0, passes_);
        break;
      case Kind::plus:
        again(node, 1, passes_);
        break;
      case Kind::repeat:
        again(node, node.least,
              std::max(node.least, std::min(node.most, passes_)));
        break;
      case Kind::start:
      case Kind::end:
      case Kind::boundary:
      case Kind::no_boundary:
        break;
    }
  }

  void again(const Node& node, int least, int most) {
    const int count = random_.between(least, most);
    for (int i = 0; i < count && text_.size() < k_longest; ++i)
      walk(*node.parts[0]);
  }

  // A byte of a set, one of the pattern's own if possible.
  char byte_of(const ByteSet& set) {
    for (int i = 0; i < 12; ++i) {
      const char c = i < 8 ? random_.of(literals_) : random_.byte();
      if (set[index_of(c)]) return c;
    }
    std::size_t byte = 0;
    while (byte < 255 && !set[byte]) ++byte;
    return static_cast<char>(byte);
  }

  std::string field(const Field& field) {
    std::string text = field_text(field);
    const auto width = static_cast<std::size_t>(std::max(field.width, 0));
    if (random_.percent(field.blank ? 20 : 2)) text.clear();
    if (text.size() < width) text.insert(0, width - text.size(), ' ');
    if (text.size() > width && width > 0 && random_.percent(50))
      text.resize(width);
    if (width == 0 && random_.percent(15)) text.insert(0, 2, ' ');
    return text;
  }

  std::string field_text(const Field& field) {
    switch (field.type) {
      case 'd':
      case 'x':
        return sign(field) + integer(field.type == 'x');
      case 'f':
      case 'v':
        return sign(field) + real();
      case 's':
        return noise(random_, random_.between(1, 6), "ab1+ \t\xe0");
      case 'C':
        return quoted(field);
      default:
        return date();
    }
  }

  std::string sign(const Field& field) {
    if (random_.percent(field.plus ? 85 : 10)) return {random_.of("+-")};
    return "";
  }

  std::string integer(bool is_hex) {
    constexpr std::string_view k_limits[] = {
        "2147483647", "2147483648",  "4294967295", "4294967296",
        "7fffffff",   "80000000",    "FFFFFFFF",   "100000000",
        "0x7FFFFFFF", "00000000001", "0x",         "0X1"};
    if (random_.percent(15)) return std::string(random_.pick(k_limits));
    if (!is_hex) return noise(random_, random_.between(1, 5), "0123456789");
    std::string text = random_.percent(25) ? "0x" : "";
    text += noise(random_, random_.between(1, 5), "0123456789abcdefABCDEF");
    if (random_.percent(25)) text += random_.of("hH");
    return text;
  }

  std::string real() {
    std::string text = noise(random_, random_.between(0, 3), "0123456789");
    if (random_.percent(60)) text += '.';
    text += noise(random_, random_.between(0, 3), "0123456789");
    if (random_.percent(25)) text += random_.of("kmKM");
    return text;
  }

  std::string quoted(const Field& field) {
    const char quote = field.plus ? random_.of("\"~'") : '"';
    std::string text(1, quote);
    const int length = random_.between(0, 4);
    for (int i = 0; i < length; ++i) {
      const char c = random_.of("ab \\~'\"");
      if (c == '\\' || c == quote) text += '\\';
      text += c;
    }
    return text + quote;
  }

  std::string date() {
    const auto number = [&](int low, int high) {
      const std::string text = std::to_string(random_.between(low, high));
      return text.size() == 1 && random_.percent(40) ? "0" + text : text;
    };
    const char separator = random_.of("/.-");
    std::string text = random_.percent(40) ? number(27, 32) : number(0, 31);
    text += separator;
    text += random_.percent(30) ? "2" : number(0, 13);
    text += random_.percent(95) ? separator : random_.of("/.-");
    constexpr std::string_view k_years[] = {
        "57",   "58",   "69",   "70",   "99",  "00",   "100", "101", "000",
        "1969", "1970", "2057", "2058", "005", "2000", "4",   "2001"};
    return text + (random_.percent(60) ? std::string(random_.pick(k_years))
                                       : number(1960, 2060));
  }

  Random& random_;
  std::string_view literals_;
  int passes_ = 3;
  std::string text_;
  std::map<int, std::string> groups_;
};

}  // namespace regex_model

#endif  // REGEX_RANDOM_H
