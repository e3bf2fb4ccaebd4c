// regex_tree.h - the dialect of patterns as a tree, for the tests: a slow,
// obvious reading of the grammar, a function for each rule.
//
// It shares nothing with zxlib/zxregexc.cpp.  What matches one byte of a set
// is one kind of node, whether it is written as a literal, a class or a dot;
// a literal run is a sequence of such nodes.  parse() recurses with the
// nesting of groups, so its patterns are short ones.
#ifndef REGEX_TREE_H
#define REGEX_TREE_H

#include <bitset>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace regex_model {

inline constexpr int k_any_more = 32767;  // the maximum of "{m,}"
inline constexpr int k_no_limit = 0x7FFFFFFF;
inline constexpr int k_max_width = 127;
inline constexpr int k_max_groups = 9;
inline constexpr int k_max_fields = 19;
inline constexpr int k_group_numbers = 11;  // those that are accepted

using ByteSet = std::bitset<256>;

inline std::size_t index_of(char c) { return static_cast<unsigned char>(c); }

// ---- bytes

inline ByteSet bytes_between(int low, int high) {
  ByteSet set;
  for (int c = low; c <= high; ++c) set.set(static_cast<std::size_t>(c));
  return set;
}
inline ByteSet just(char c) { return ByteSet().set(index_of(c)); }

inline ByteSet digits() { return bytes_between('0', '9'); }
inline ByteSet word_bytes() {
  return digits() | bytes_between('a', 'z') | bytes_between('A', 'Z');
}
inline ByteSet space_bytes() { return bytes_between(9, 13) | just(' '); }
inline ByteSet hebrew_862() { return bytes_between(128, 154); }
inline ByteSet hebrew_1255() { return bytes_between(224, 250); }

// The class that a letter behind a backtick stands for, a capital for all
// other bytes; none if it stands for no class.
inline std::optional<ByteSet> class_of_letter(char letter) {
  switch (letter) {
    case 'a':
      return hebrew_1255();
    case 'd':
      return digits();
    case 'h':
      return hebrew_862();
    case 's':
      return space_bytes();
    case 'w':
      return word_bytes();
    case 'A':
    case 'D':
    case 'H':
    case 'S':
    case 'W':
      return ~*class_of_letter(static_cast<char>(letter - 'A' + 'a'));
    default:
      return {};
  }
}

// The byte that a letter behind a backtick stands for.
inline char byte_of_letter(char letter) {
  switch (letter) {
    case 'f':
      return '\f';
    case 'n':
      return '\n';
    case 'r':
      return '\r';
    case 't':
      return '\t';
    default:
      return letter;
  }
}

// ---- the tree

enum class Kind {
  start,           // of the subject
  end,             // of the subject
  byte,            // one of `bytes`
  boundary,        // of a word
  no_boundary,     // of a word
  back_reference,  // to group `number`
  field,           // `field`, of index `number`
  sequence,        // all of `parts`, in order
  choice,          // one of `parts`
  group,           // parts[0]; `number` is 0 if it captures nothing
  optional,        // parts[0] or nothing
  star,            // any number of parts[0], which may be anything
  plus,            // one and more of parts[0], which may be anything
  repeat,          // `least` to `most` of parts[0], which is one byte
};

struct Field {
  char type = 0;
  int width = -1;        // -1: as wide as it gets
  bool no_skip = false;  // 0: blanks ahead of it are not skipped
  bool blank = false;    // blank: it may be empty or blank
  bool plus = false;     // +: a sign, or more kinds of quotes
  bool equals = false;   // =: no sign, all of 32 bits
};

struct Node {
  Kind kind;
  ByteSet bytes = {};
  int number = 0;
  int least = 0;
  int most = 0;
  bool lazy = false;
  bool has_width = false;  // it can't match the empty text
  Field field = {};
  std::vector<std::unique_ptr<Node>> parts = {};

  bool takes_one_byte() const { return kind == Kind::byte; }
};
using Tree = std::unique_ptr<Node>;

// ---- the parser

class Parser {
 public:
  explicit Parser(std::string_view pattern) : rest_(pattern) {}

  // Null if the pattern is not valid.
  Tree parse() {
    Tree tree = choice();
    return rest_.empty() ? std::move(tree) : nullptr;
  }

 private:
  struct Count {
    int least;
    int most;
    std::size_t length;  // of its text
  };

  static Tree make(Kind kind, bool has_width = false) {
    Tree node = std::make_unique<Node>();
    node->kind = kind;
    node->has_width = has_width;
    return node;
  }
  static Tree make_byte(const ByteSet& bytes) {
    Tree node = make(Kind::byte, true);
    node->bytes = bytes;
    return node;
  }

  bool is_next(std::string_view text) const { return rest_.starts_with(text); }
  bool is_next_of(std::string_view bytes) const {
    return !rest_.empty() && bytes.find(rest_[0]) != bytes.npos;
  }
  bool take(std::string_view text) {
    if (!is_next(text)) return false;
    rest_.remove_prefix(text.size());
    return true;
  }
  char take_byte() {
    const char c = rest_[0];
    rest_.remove_prefix(1);
    return c;
  }
  static bool is_digit(char c) { return c >= '0' && c <= '9'; }

  // choice: sequence { "|" sequence }
  Tree choice() {
    Tree node = make(Kind::choice, true);
    do {
      Tree part = sequence();
      if (!part) return nullptr;
      node->has_width = node->has_width && part->has_width;
      node->parts.push_back(std::move(part));
    } while (take("|"));
    return node;
  }

  // sequence: { piece }, up to what closes or divides a group
  Tree sequence() {
    Tree node = make(Kind::sequence);
    while (!rest_.empty() && !is_next_of("|)") && !is_next("}}")) {
      Tree part = piece();
      if (!part) return nullptr;
      node->has_width = node->has_width || part->has_width;
      node->parts.push_back(std::move(part));
    }
    return node;
  }

  // piece: atom [ quantifier ], no second quantifier
  Tree piece() {
    Tree node = atom();
    if (!node) return nullptr;
    node = quantified(std::move(node));
    if (is_next_of("*+?") || count()) return nullptr;
    return node;
  }

  Tree quantified(Tree node) {
    if (take("?")) return wrapped(Kind::optional, std::move(node), false);

    int least = 0;
    int most = k_any_more;
    bool is_counted = false;
    if (const auto counted = count()) {
      rest_.remove_prefix(counted->length);
      least = counted->least;
      most = counted->most;
      is_counted = true;
      if (least > most || most > k_any_more) return nullptr;
    } else if (take("+")) {
      least = 1;
      most = k_no_limit;
    } else if (take("*")) {
      most = k_no_limit;
    } else {
      return node;
    }

    if (!node->has_width) return nullptr;
    const bool has_width = is_counted || least > 0;
    if (!node->takes_one_byte()) {
      if (is_counted) return nullptr;
      return wrapped(least ? Kind::plus : Kind::star, std::move(node),
                     has_width);
    }
    Tree whole = wrapped(Kind::repeat, std::move(node), has_width);
    whole->least = least;
    whole->most = most;
    whole->lazy = take("?");
    return whole;
  }

  static Tree wrapped(Kind kind, Tree part, bool has_width) {
    Tree node = make(kind, has_width);
    node->parts.push_back(std::move(part));
    return node;
  }

  // count: "{" digits [ "," [ digits ] ] "}", which is only looked at
  std::optional<Count> count() const {
    std::size_t at = 0;
    const auto number = [&] {
      int value = 0;
      for (; at < rest_.size() && is_digit(rest_[at]); ++at)
        if (value < 1'000'000) value = value * 10 + rest_[at] - '0';
      return value;
    };
    if (!is_next("{")) return {};
    at = 1;
    const int least = number();
    if (at == 1) return {};
    int most = least;
    if (at < rest_.size() && rest_[at] == ',') {
      const std::size_t behind = ++at;
      most = number();
      if (at == behind) most = k_any_more;
    }
    if (at == rest_.size() || rest_[at] != '}') return {};
    return Count{least, most, at + 1};
  }

  Tree atom() {
    if (take("^")) return make(Kind::start);
    if (take("$")) return make(Kind::end);
    if (take(".")) return make_byte(~ByteSet());
    if (take("(")) return group(true);
    if (take("{{")) return group(false);
    if (take("[")) return byte_class();
    if (take("%")) return field();
    if (take("`") || take("\\")) return escape();
    if (is_next_of("*+?") || count()) return nullptr;
    if (is_next("{")) ++open_braces_;
    // A closing brace is a literal if an opening one was, for each one.
    if (is_next("}") && open_braces_-- == 0) return nullptr;
    return make_byte(just(take_byte()));
  }

  // group: "(" choice ")" | "{{" choice "}}"
  Tree group(bool captures) {
    if (groups_ == k_group_numbers) return nullptr;
    const int number = captures ? ++groups_ : 0;
    Tree body = choice();
    if (!body || !take(captures ? ")" : "}}")) return nullptr;
    const bool has_width = body->has_width;
    Tree node = wrapped(Kind::group, std::move(body), has_width);
    node->number = number;
    return node;
  }

  // Three digits, which must be a byte in octal; none if these are not three
  // digits.
  bool are_three_digits() const {
    return rest_.size() >= 3 && is_digit(rest_[0]) && is_digit(rest_[1]) &&
           is_digit(rest_[2]);
  }
  std::optional<char> octal() {
    int value = 0;
    for (int i = 0; i < 3; ++i) {
      const char digit = take_byte();
      if (digit > '7') return {};
      value = value * 8 + digit - '0';
    }
    if (value > 255) return {};
    return static_cast<char>(value);
  }

  // escape: what stands behind a backtick or a backslash
  Tree escape() {
    if (rest_.empty()) return nullptr;
    if (are_three_digits()) {
      const auto byte = octal();
      return byte ? make_byte(just(*byte)) : nullptr;
    }
    const char c = take_byte();
    if (c == '0') return make_byte(just('\0'));
    if (is_digit(c)) {
      Tree node = make(Kind::back_reference);
      node->number = c - '0';
      return node;
    }
    if (const auto bytes = class_of_letter(c)) return make_byte(*bytes);
    if (c == 'b') return make(Kind::boundary);
    if (c == 'B') return make(Kind::no_boundary);
    return make_byte(just(byte_of_letter(c)));
  }

  // byte_class: "[" [ "^" ] member { member } "]"
  // member: bytes | byte "-" byte
  Tree byte_class() {
    const bool is_negated = take("^");
    ByteSet set;
    do {
      const auto low = member();  // the first may be "]"
      if (!low) return nullptr;
      if (!is_next("-") || is_next("-]")) {
        set |= *low;
        continue;
      }
      take("-");
      const auto high = member();
      if (!high || low->count() != 1 || high->count() != 1) return nullptr;
      if (lowest(*high) < lowest(*low)) return nullptr;
      set |= bytes_between(lowest(*low), lowest(*high));
    } while (!take("]"));
    return make_byte(is_negated ? ~set : set);
  }

  static int lowest(const ByteSet& set) {
    int byte = 0;
    while (!set[static_cast<std::size_t>(byte)]) ++byte;
    return byte;
  }

  // A member of a class: a byte or all of another class.
  std::optional<ByteSet> member() {
    if (rest_.empty()) return {};
    if (!take("`") && !take("\\")) return just(take_byte());
    if (rest_.empty()) return {};
    if (are_three_digits()) {
      const auto byte = octal();
      if (!byte) return {};
      return just(*byte);
    }
    const char c = take_byte();
    if (const auto bytes = class_of_letter(c)) return bytes;
    return just(c == '0' ? '\0' : byte_of_letter(c));
  }

  // field: "%" { flag } [ width ] [ anything ] letter
  Tree field() {
    const std::size_t letter = rest_.find_first_of("dxfvstC");
    if (letter == rest_.npos) return nullptr;
    const std::string_view text = rest_.substr(0, letter);
    Tree node = make(Kind::field);
    Field& field = node->field;
    field.type = rest_[letter];
    rest_.remove_prefix(letter + 1);

    std::size_t at = 0;
    bool is_as_written = false;
    for (; at < text.size(); ++at) {
      const char flag = text[at];
      if (flag == '0')
        field.no_skip = true;
      else if (flag == ' ')
        field.blank = true;
      else if (flag == '+')
        field.plus = true;
      else if (flag == '=')
        field.equals = true;
      else if (flag == '_')
        is_as_written = true;
      else if (flag != '*' && flag != '-')
        break;
    }
    if (at < text.size() && is_digit(text[at])) {
      if (is_as_written) return nullptr;
      field.width = 0;
      for (; at < text.size() && is_digit(text[at]); ++at)
        if (field.width < 1000) field.width = field.width * 10 + text[at] - '0';
    }
    if (is_as_written) field.width = static_cast<int>(text.size()) + 2;
    if (field.width > k_max_width) return nullptr;
    if (field.type == 's' && (field.plus || field.equals)) return nullptr;
    if (fields_ == k_max_fields) return nullptr;
    node->number = fields_++;
    node->has_width = field.width >= 0 || !field.blank;
    return node;
  }

  std::string_view rest_;
  int open_braces_ = 0;  // literal ones without a closing one so far
  int groups_ = 0;
  int fields_ = 0;
};

// The tree of a pattern; null if it is not valid.
inline Tree parse(std::string_view pattern) { return Parser(pattern).parse(); }

}  // namespace regex_model

#endif  // REGEX_TREE_H
