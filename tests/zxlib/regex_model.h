// regex_model.h - a second pattern matcher for the tests: the tree of
// regex_tree.h run by plain recursion, each node being told what is to follow
// it.  Slow and obvious; it shares nothing with zxlib/zxregexe.cpp.
//
// All that a run leaves is here: span, groups, the texts before and behind,
// fields, and the counters of alternatives, which are not put back when a try
// fails and so tell of the order in which all tries were made.
#ifndef REGEX_MODEL_H
#define REGEX_MODEL_H

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "regex_tree.h"

namespace regex_model {

// ---- what a run leaves

inline constexpr int k_unset = -1;

// Offsets in the subject.
struct Span {
  int start = k_unset;
  int end = k_unset;
  friend bool operator==(const Span&, const Span&) = default;
};

struct FieldSpan {
  char type = 0;
  Span span;
  friend bool operator==(const FieldSpan&, const FieldSpan&) = default;
};

struct Outcome {
  bool matched = false;
  std::array<Span, 12> groups = {};
  std::array<int, 12> counters = {};
  std::array<FieldSpan, 20> fields = {};
  friend bool operator==(const Outcome&, const Outcome&) = default;
};

// ---- fields

// Reads the field that begins at a place of the subject.
class FieldReader {
 public:
  FieldReader(const Field& field, std::string_view subject, int start)
      : field_(field), subject_(subject), start_(start), at_(start) {}

  // Where the field ends; none if there is no such field.
  std::optional<int> end() {
    switch (field_.type) {
      case 'd':
      case 'x':
        return integer();
      case 'f':
      case 'v':
        return real();
      case 's':
        return token();
      case 'C':
        return quoted();
      default:
        return date();
    }
  }

 private:
  using End = std::optional<int>;

  bool has_width() const { return field_.width >= 0; }
  int used() const { return at_ - start_; }
  bool is_full() const { return has_width() && used() == field_.width; }
  int left() const { return static_cast<int>(subject_.size()) - at_; }
  // The byte at the place within the subject and the width; none behind them.
  std::optional<char> next() const {
    if (left() == 0 || is_full()) return {};
    return subject_[static_cast<std::size_t>(at_)];
  }
  bool is_next_of(std::string_view bytes) const {
    const auto c = next();
    return c && bytes.find(*c) != bytes.npos;
  }
  bool take_one_of(std::string_view bytes) {
    if (!is_next_of(bytes)) return false;
    ++at_;
    return true;
  }
  End end_here() const {
    if (has_width() && used() != field_.width) return {};
    return at_;
  }

  void skip_blanks() {
    if (!field_.no_skip)
      while (take_one_of(" ")) continue;
  }

  // The sign ahead of a number; false if it is not as the flags want it.
  bool take_sign(bool& is_there) {
    is_there = take_one_of("+-");
    if (is_there) return !field_.equals && !is_full();
    return !field_.plus;
  }

  static int digit_value(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return 99;
  }

  // "0x", with a byte of the subject behind it and not filling the width.
  bool take_prefix() {
    if (left() < 3 || (has_width() && used() + 2 >= field_.width)) return false;
    const std::string_view two =
        subject_.substr(static_cast<std::size_t>(at_), 2);
    if (two != "0x" && two != "0X") return false;
    at_ += 2;
    return true;
  }

  End integer() {
    skip_blanks();
    if (is_full()) return field_.blank ? End(at_) : End();
    bool has_sign = false;
    if (!take_sign(has_sign)) return {};

    const bool is_hex = field_.type == 'x';
    const bool has_prefix = is_hex && take_prefix();
    const int base = is_hex ? 16 : 10;
    const std::uint64_t most = field_.equals ? 0xFFFFFFFF : 0x7FFFFFFF;
    std::uint64_t value = 0;
    bool has_digits = false;
    for (auto c = next(); c && digit_value(*c) < base; c = next()) {
      value = value * static_cast<unsigned>(base) +
              static_cast<unsigned>(digit_value(*c));
      if (value > most) return {};
      has_digits = true;
      ++at_;
    }
    if (!has_digits && (!field_.blank || has_sign || has_prefix)) return {};
    if (is_hex && has_digits && !has_prefix) take_one_of("hH");
    return end_here();
  }

  End real() {
    skip_blanks();
    if (is_full()) return field_.blank ? End(at_) : End();
    bool has_sign = false;
    if (!take_sign(has_sign)) return {};

    bool has_digits = false;
    bool has_point = false;
    while (true) {
      if (take_one_of("0123456789"))
        has_digits = true;
      else if (!has_point && take_one_of("."))
        has_point = true;
      else
        break;
    }
    if (field_.type == 'v') take_one_of("km");
    if (!has_digits && (!field_.blank || has_sign || has_point)) return {};
    return end_here();
  }

  End token() {
    bool has_text = false;
    if (!has_width()) {
      while (next() && !space_bytes()[index_of(*next())]) {
        has_text = true;
        ++at_;
      }
    } else {
      for (; next(); ++at_)
        if (*next() != ' ') has_text = true;
    }
    if (!has_text && !field_.blank) return {};
    return end_here();
  }

  End quoted() {
    skip_blanks();
    const auto quote = next();
    if (!take_one_of(field_.plus ? "\"~'" : "\"")) return {};
    for (auto c = next(); c; c = next()) {
      ++at_;
      if (*c == *quote) return end_here();
      if (*c == '\\' && next()) ++at_;
    }
    return {};
  }

  // One to `most` digits; none if there are more or fewer.
  std::optional<int> date_part(int most) {
    int value = 0;
    int count = 0;
    for (; left() > 0; ++at_, ++count) {
      const int digit = digit_value(subject_[static_cast<std::size_t>(at_)]);
      if (digit > 9) break;
      if (count == most) return {};
      value = value * 10 + digit;
    }
    if (count == 0) return {};
    return value;
  }

  // The width means nothing to a date.
  End date() {
    const auto separator = [&] {
      const bool is_one = left() > 0 && std::string_view("/.-").find(
                                            subject_[at()]) != subject_.npos;
      return is_one ? subject_[at()] : '\0';
    };
    const auto day = date_part(2);
    const char first = separator();
    if (!day || !first) return {};
    ++at_;
    const auto month = date_part(2);
    if (!month || separator() != first) return {};
    ++at_;
    const auto year = date_part(4);
    if (!year || !is_day(*day, *month, *year)) return {};
    return at_;
  }
  std::size_t at() const { return static_cast<std::size_t>(at_); }

  static bool is_day(int day, int month, int year) {
    if (year > 2057 || (year > 100 && year < 1970)) return false;
    if (year > 57 && year < 70) return false;
    if (month < 1 || month > 12 || day < 1) return false;
    if (month == 2) return day <= (year % 4 == 0 ? 29 : 28);
    const bool is_short = month == 4 || month == 6 || month == 9 || month == 11;
    return day <= (is_short ? 30 : 31);
  }

  const Field& field_;
  std::string_view subject_;
  int start_;
  int at_;
};

// ---- the run

// How much a run may cost before it is given up: visits of nodes, and how
// deep they are nested.
struct Budget {
  long steps = 100'000;
  int depth = 1500;
};

// A reference to the function that runs what follows a node, from a position
// and with a current group; true if that led to the end of the pattern.
class Then {
 public:
  template <class Function>
  Then(const Function& function)  // NOLINT: made from any function
      : function_(&function), call_([](const void* f, int at, int group) {
          return (*static_cast<const Function*>(f))(at, group);
        }) {}
  Then(const Then&) = default;
  bool operator()(int at, int group) const {
    return call_(function_, at, group);
  }

 private:
  const void* function_;
  bool (*call_)(const void*, int, int);
};

class Matcher {
 public:
  Matcher(const Node& pattern, std::string_view subject, Budget budget = {})
      : pattern_(pattern),
        subject_(subject),
        size_(static_cast<int>(subject.size())),
        budget_(budget) {}

  // The subject is the rest of a longer text, with that byte ahead of it.
  void go_on_behind(char before) { before_ = before; }

  // Searches the subject; none if that is too expensive.
  std::optional<Outcome> search() {
    for (int at = 0; at <= size_ && !out_.matched; ++at) try_at(at);
    if (is_too_expensive_) return {};
    if (!out_.matched) return Outcome{};
    forget_other_counters();
    return out_;
  }

  long steps() const { return steps_; }

 private:
  void try_at(int start) {
    int end = 0;
    out_.matched = run(pattern_, start, 0, [&](int at, int) {
      end = at;
      return true;
    });
    if (!out_.matched) return;
    out_.groups[0] = {start, end};
    out_.groups[10] = {0, start};
    out_.groups[11] = {end, size_};
  }

  // The counters of groups that took no part are nobody's business.
  void forget_other_counters() {
    for (std::size_t n = 1; n < 12; ++n)
      if (n > k_max_groups || out_.groups[n].start == k_unset)
        out_.counters[n] = 0;
  }

  // Runs a node at a position of the subject and then what follows it.
  bool run(const Node& node, int at, int group, Then then) {
    if (is_too_expensive_) return false;
    if (++steps_ > budget_.steps || depth_ >= budget_.depth) {
      is_too_expensive_ = true;
      return false;
    }
    ++depth_;
    const bool matched = run_kind(node, at, group, then);
    --depth_;
    return matched;
  }

  bool run_kind(const Node& node, int at, int group, Then then) {
    switch (node.kind) {
      case Kind::start:
        return at == 0 && !before_ && then(at, group);
      case Kind::end:
        return at == size_ && then(at, group);
      case Kind::byte:
        return fits(node, at) && then(at + 1, group);
      case Kind::boundary:
        return is_boundary(at) && then(at, group);
      case Kind::no_boundary:
        return !is_boundary(at) && then(at, group);
      case Kind::back_reference:
        return run_back_reference(node, at, group, then);
      case Kind::field:
        return run_field(node, at, group, then);
      case Kind::sequence:
        return run_sequence(node, 0, at, group, then);
      case Kind::choice:
        return run_choice(node, at, group, then);
      case Kind::group:
        return run_group(node, at, group, then);
      case Kind::optional:
        return run_optional(node, at, group, then);
      case Kind::star:
        return run_star(node, at, group, then);
      case Kind::plus:
        return run(*node.parts[0], at, group, [&](int next, int inner) {
          return run_plus_again(node, next, inner, then);
        });
      case Kind::repeat:
        return run_repeat(node, at, group, then);
    }
    return false;
  }

  // ---- bytes

  char byte_at(int at) const { return subject_[static_cast<std::size_t>(at)]; }

  bool fits(const Node& node, int at) const {
    return at < size_ && node.bytes[index_of(byte_at(at))];
  }

  static bool is_word(char c) {
    return (word_bytes() | hebrew_862())[index_of(c)];
  }
  bool is_boundary(int at) const {
    const bool before =
        at > 0 ? is_word(byte_at(at - 1)) : before_ && is_word(*before_);
    const bool behind = at < size_ && is_word(byte_at(at));
    return before != behind;
  }

  // The bytes of the group must stand here.  A group that is not closed, or
  // was closed ahead of where it begins now, has none.
  bool run_back_reference(const Node& node, int at, int group, Then then) {
    const Span span = out_.groups[static_cast<std::size_t>(node.number)];
    if (span.start == k_unset || span.end < span.start) return false;
    const int length = span.end - span.start;
    if (at + length > size_) return false;
    for (int i = 0; i < length; ++i)
      if (byte_at(at + i) != byte_at(span.start + i)) return false;
    return then(at + length, group);
  }

  bool run_field(const Node& node, int at, int group, Then then) {
    const auto end = FieldReader(node.field, subject_, at).end();
    if (!end) return false;
    FieldSpan& field = out_.fields[static_cast<std::size_t>(node.number)];
    const FieldSpan before = field;
    field = {node.field.type, {at, *end}};
    if (then(*end, group)) return true;
    field = before;
    return false;
  }

  // ---- sequences and choices

  bool run_sequence(const Node& node, std::size_t part, int at, int group,
                    Then then) {
    if (part == node.parts.size()) return then(at, group);
    return run(*node.parts[part], at, group, [&](int next, int inner) {
      return run_sequence(node, part + 1, next, inner, then);
    });
  }

  int& counter(int group) {
    return out_.counters[static_cast<std::size_t>(group)];
  }

  // The counter goes on from whatever the tries within the last alternative
  // have made of it.
  bool run_choice(const Node& node, int at, int group, Then then) {
    if (node.parts.size() == 1) return run(*node.parts[0], at, group, then);
    counter(group) = 0;
    for (const Tree& part : node.parts) {
      ++counter(group);
      if (run(*part, at, group, then)) return true;
    }
    return false;
  }

  // What behaves like a choice of two: `first` or, behind it, `second`.
  template <class First, class Second>
  bool choose(int group, First first, Second second) {
    counter(group) = 1;
    if (first()) return true;
    ++counter(group);
    return second();
  }

  bool run_group(const Node& node, int at, int group, Then then) {
    const Node& body = *node.parts[0];
    if (node.number == 0) return run(body, at, 0, then);
    if (node.number > k_max_groups) return run(body, at, group, then);

    Span& span = out_.groups[static_cast<std::size_t>(node.number)];
    const int old_start = span.start;
    span.start = at;
    counter(node.number) = 0;
    const bool matched = run(body, at, node.number, [&](int next, int inner) {
      const int old_end = span.end;
      span.end = next;
      if (then(next, inner)) return true;
      span.end = old_end;
      return false;
    });
    if (!matched) span.start = old_start;
    return matched;
  }

  // ---- repetitions

  bool run_optional(const Node& node, int at, int group, Then then) {
    return choose(
        group, [&] { return run(*node.parts[0], at, group, then); },
        [&] { return then(at, group); });
  }

  // A pass that ends where it began fails.
  bool run_star(const Node& node, int at, int group, Then then) {
    const auto pass = [&] {
      return run(*node.parts[0], at, group, [&](int next, int inner) {
        return next != at && run(node, next, inner, then);
      });
    };
    return choose(group, pass, [&] { return then(at, group); });
  }

  // Behind a pass of a loop that makes one at least; the first pass may be
  // empty, the others fail if they are.
  bool run_plus_again(const Node& node, int at, int group, Then then) {
    const auto pass = [&] {
      return run(*node.parts[0], at, group, [&](int next, int inner) {
        return next != at && run_plus_again(node, next, inner, then);
      });
    };
    return choose(group, pass, [&] { return then(at, group); });
  }

  bool run_repeat(const Node& node, int at, int group, Then then) {
    int most = 0;
    while (most < node.most && fits(*node.parts[0], at + most)) ++most;
    if (node.lazy) {
      for (int count = node.least; count <= most; ++count)
        if (then(at + count, group)) return true;
    } else {
      for (int count = most; count >= node.least; --count)
        if (then(at + count, group)) return true;
    }
    return false;
  }

  const Node& pattern_;
  std::string_view subject_;
  int size_;
  Budget budget_;
  std::optional<char> before_;
  Outcome out_;
  long steps_ = 0;
  int depth_ = 0;
  bool is_too_expensive_ = false;
};

}  // namespace regex_model

#endif  // REGEX_MODEL_H
