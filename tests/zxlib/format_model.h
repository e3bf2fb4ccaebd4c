// format_model.h - a second, slow interpreter of the format language, which
// the tests compare the library's with.
//
// It reads a format byte by byte, keeps everything in std::string and leaves
// the digits of doubles to the C library.  It has no number pictures, but for
// a few texts that it is given, and knows nothing of how ours works.
//
//   Model model(format, arguments, world);
//   const Outcome outcome = model.run();
//
// Arguments are told by what the language shows of them; the world is what
// formats can refer to.
#ifndef TESTS_ZXLIB_FORMAT_MODEL_H
#define TESTS_ZXLIB_FORMAT_MODEL_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <ctime>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace format_model {

// An argument.  Which members count goes by the tag.
struct Value {
  std::uint32_t tag = 0;
  std::int64_t number = 0;           // i l u v c b B
  double real = 0;                   // f
  std::string text = {};             // z s 1; "#" of t M m
  std::vector<std::string> texts{};  // k
  std::uintptr_t address = 0;        // p
  std::string date = {};             // "%t" of t M
  std::string forms[6] = {};         // "%.0T" to "%.5T" of M m
  std::tm fields = {};               // "%[...]t" of t M m
  std::vector<Value> elements{};     // of a list, tag 4
  const std::map<std::string, std::string>* table = nullptr;  // tag 3
  // "%[PICTURE]v" without a width and a precision, by picture.
  std::map<std::string, std::string> pictures{};
};

// What escapes and environments give.
struct World {
  std::array<std::string, 12> groups;
  std::string now_3, now_1, now_2;  // the present moment by forms
  std::vector<std::string> program_args;
  std::string program_path;
  std::string program_name;
  std::map<std::string, std::string> variables;  // of the process
  std::function<std::string(const Value&)> left;
  std::function<std::string(const Value&)> right;
};

enum class Kind {
  good,       // the whole text
  bad,        // a bad format
  assertion,  // a mistake of the program, not of the format
  not_told,   // any text, or an assertion
  huge,       // too large a text to look at
};

struct Outcome {
  Kind kind;
  std::string text;

  friend bool operator==(const Outcome&, const Outcome&) = default;
};

// The ways in which a format ends early.
struct BadDirective {};  // the rest of the format is added
struct BadStar {};       // nothing is added
struct Mistake {};
struct NotTold {};
struct Huge {};

inline bool is_digit(char byte) { return byte >= '0' && byte <= '9'; }

// The parts of a "%" directive's text up to its letter.
struct Spec {
  std::string flags;
  std::string width;
  bool has_point = false;
  std::string precision;
  bool has_l = false;
  std::optional<std::string> bracket = {};
  char letter = 0;

  bool has(char flag) const { return flags.find(flag) != flags.npos; }
  bool is_left() const { return has('-') || width.starts_with('-'); }
  std::size_t width_digits() const {
    const std::string digits = width.substr(width.starts_with('-') ? 1 : 0);
    return digits.empty() ? 0 : std::stoul(digits);
  }
  std::size_t precision_digits() const {
    return precision.empty() ? 0 : std::stoul(precision);
  }
  std::string point_and_precision() const {
    return has_point ? "." + precision : "";
  }
};

class Model {
 public:
  Model(std::string_view format_text, std::vector<Value> arguments,
        World& the_world,
        const std::map<std::string, std::string>* a_table = nullptr)
      : format(format_text),
        args(std::move(arguments)),
        world(the_world),
        table(a_table) {}

  Outcome run() {
    try {
      while (byte() != '\0') step();
      return {args.empty() ? Kind::good : Kind::bad, out};
    } catch (const BadDirective&) {
      return {Kind::bad, out + format.substr(mark)};
    } catch (const BadStar&) {
      return {Kind::bad, out};
    } catch (const Mistake&) {
      return {Kind::assertion, ""};
    } catch (const NotTold&) {
      return {Kind::not_told, ""};
    } catch (const Huge&) {
      return {Kind::huge, ""};
    }
  }

 private:
  static constexpr std::size_t k_spec_limit = 31;
  static constexpr std::size_t k_bracket_limit = 19;
  static constexpr std::size_t k_text_limit = 255;
  static constexpr std::int64_t k_most = 9999;  // of widths and columns

  // ---- the format and the arguments

  char byte() const { return at < format.size() ? format[at] : '\0'; }
  char next() {
    const char c = byte();
    if (c != '\0') ++at;
    return c;
  }
  std::string digits() {
    std::string found;
    while (is_digit(byte())) found += next();
    if (found.size() > 40 ||
        (!found.empty() &&
         std::stold(found) > static_cast<long double>(k_most)))
      throw Huge{};
    return found;
  }

  template <class Missing>
  Value take() {
    if (args.empty()) throw Missing{};
    if (args[0].tag != 4) {
      const Value value = args[0];
      args.erase(args.begin());
      return value;
    }
    std::vector<Value>& elements = args[0].elements;
    if (elements.empty()) throw Missing{};
    const Value value = elements[0];
    elements.erase(elements.begin());
    if (elements.empty()) args.clear();
    return value;
  }

  // ---- the scanner

  void step() {
    mark = at;
    const char c = next();
    const bool is_mark = c == '%' || c == '$' || c == '#';
    if (is_mark && byte() == c) {
      out += next();
    } else if (c == '#') {
      out += default_form(take<BadDirective>());
    } else if (c == '$') {
      take_table();
      escape();
    } else if (c == '%') {
      directive();
    } else {
      out += c == '\n' ? std::string("\r\n") : std::string(1, c);
    }
  }

  std::string default_form(const Value& value) const {
    switch (value.tag) {
      case 'i':
      case 'l':
        return std::to_string(static_cast<std::int32_t>(value.number));
      case 'u':
      case 'v':
        return std::to_string(static_cast<std::uint32_t>(value.number));
      case 'c':
        return std::string(1, static_cast<char>(value.number));
      case 'b':
        return "\\x" + printed("%x", static_cast<unsigned>(value.number));
      case 'B':
        return value.number != 0 ? "true" : "false";
      case 'f':
        return widened(printed("%.15g", value.real));
      case 'z':
      case 's':
      case 1:
      case 't':
      case 'M':
      case 'm':
        return value.text;
      case 'k':
        return joined(value.texts, " ");
      case 'p':
        return address_text(value);
      case 0:
        throw Mistake{};
      default:
        throw NotTold{};
    }
  }

  static std::string joined(const std::vector<std::string>& texts,
                            const std::string& between) {
    std::string all;
    for (std::size_t i = 0; i < texts.size(); ++i)
      all += (i == 0 ? "" : between) + texts[i];
    return all;
  }

  static std::string address_text(const Value& value) {
    std::string text;
    for (std::size_t i = 2 * sizeof(void*); i-- > 0;)
      text += "0123456789ABCDEF"[value.address >> (4 * i) & 15];
    return text;
  }

  // ---- "%" directives

  void directive() {
    if (byte() == '<' || byte() == '>') {
      const char side = next();
      const Value value = take<BadDirective>();
      out += side == '<' ? world.left(value) : world.right(value);
      return;
    }
    const Spec spec = read_spec();
    const Value value = take<BadDirective>();
    if (value.tag == 'z' && (value.text == "err" || value.text == "void"))
      out = value.text;
    else
      out += formatted(spec, value);
  }

  Spec read_spec() {
    Spec spec;
    room = k_spec_limit - 1;  // behind the "%"
    while (byte() == ' ' || byte() == '#' || byte() == '+' || byte() == '-')
      spec.flags += counted(std::string(1, next()));
    spec.width = read_number();
    if (byte() == '.') {
      counted(std::string(1, next()));
      spec.has_point = true;
      spec.precision = read_number();
    }
    if (byte() == '[') spec.bracket = read_bracket();
    if (byte() == 'l') {
      counted(std::string(1, next()));
      spec.has_l = true;
    }
    spec.letter = next();  // at the format's end it is none that is known
    counted(std::string(1, spec.letter));
    return spec;
  }

  std::string counted(const std::string& text) {
    if (text.size() > room) throw BadDirective{};
    room -= text.size();
    return text;
  }

  std::string read_number() {
    if (byte() != '*') return counted(digits());
    next();
    const Value value = take<BadStar>();
    if (value.tag != 'i') throw BadStar{};
    if (value.number > k_most || value.number < -k_most) throw Huge{};
    return counted(std::to_string(value.number));
  }

  std::string read_bracket() {
    next();
    std::string text;
    while (byte() != ']') {
      if (byte() == '\0' || text.size() == k_bracket_limit)
        throw BadDirective{};
      text += next();
    }
    next();
    return text;
  }

  std::string formatted(Spec spec, const Value& value) {
    const std::string bracketed = "Ttv";
    if (spec.bracket && bracketed.find(spec.letter) == bracketed.npos)
      throw BadDirective{};
    if (spec.precision.starts_with('-')) throw NotTold{};
    switch (spec.letter) {
      case 'd':
      case 'i':
      case 'o':
      case 'u':
      case 'x':
      case 'X':
        return whole_number(spec, value);
      case 'c':
        return character(spec, value);
      case 'e':
      case 'E':
      case 'f':
      case 'g':
      case 'G':
        return real_number(spec, value);
      case 'p':
        return address(spec, value);
      case 's':
        need(value, "sz");
        return padded(spec, value.text);
      case 'z':
        need(value, "z");
        return padded(spec, value.text);
      case 'h':
        need(value, "sz");
        return padded(spec, {value.text.rbegin(), value.text.rend()});
      case 'L':
        return list_of_strings(spec, value);
      case 'T':
        return moment(spec, value);
      case 't':
        return spec.bracket ? by_template(spec, value) : date(spec, value);
      case 'v':
        return picture(spec, value);
      default:
        throw BadDirective{};
    }
  }

  static void need(const Value& value, std::string_view tags) {
    if (value.tag < 32 || tags.find(static_cast<char>(value.tag)) == tags.npos)
      throw BadDirective{};
  }

  template <class T>
  static std::string printed(const std::string& form, T value) {
    char text[4096];
    const int length = std::snprintf(text, sizeof text, form.c_str(), value);
    if (length < 0 || length >= static_cast<int>(sizeof text)) throw Mistake{};
    return text;
  }

  static std::string short_enough(const std::string& text) {
    if (text.size() > k_text_limit) throw Mistake{};
    return text;
  }

  static std::string digits_of(std::uint32_t number, char letter) {
    const unsigned base = letter == 'o'                    ? 8
                          : letter == 'x' || letter == 'X' ? 16
                                                           : 10;
    const std::string all =
        letter == 'X' ? "0123456789ABCDEF" : "0123456789abcdef";
    std::string digits;
    for (; number > 0; number /= base) digits.insert(0, 1, all[number % base]);
    return digits;
  }

  static std::string sign_of(const Spec& spec, std::int64_t number) {
    if (number < 0) return "-";
    return spec.has('+') ? "+" : spec.has(' ') ? " " : "";
  }

  // As C has it, which not every run time keeps to.
  static std::string whole_number(const Spec& spec, const Value& value) {
    need(value, "lviuBcb");
    const auto number = static_cast<std::int32_t>(value.number);
    const bool is_signed = spec.letter == 'd' || spec.letter == 'i';
    const auto bits = static_cast<std::uint32_t>(number);
    const std::uint32_t size = is_signed && number < 0 ? 0 - bits : bits;
    std::string ahead = is_signed ? sign_of(spec, number) : "";
    if (spec.has('#') && number != 0 && (spec.letter | 32) == 'x')
      ahead = std::string("0") + spec.letter;
    std::string digits = digits_of(size, spec.letter);
    const std::size_t least = spec.has_point ? spec.precision_digits() : 1;
    while (digits.size() < least) digits.insert(0, "0");
    if (spec.has('#') && spec.letter == 'o' && !digits.starts_with('0'))
      digits.insert(0, "0");
    if (spec.width.starts_with('0') && !spec.is_left() && !spec.has_point)
      while (ahead.size() + digits.size() < spec.width_digits())
        digits.insert(0, "0");
    return short_enough(filled(spec, ahead + digits));
  }

  // Blanks up to the width; on the left unless the text stands there.
  static std::string filled(const Spec& spec, const std::string& text) {
    const std::size_t width = spec.width_digits();
    const std::string blanks(width > text.size() ? width - text.size() : 0,
                             ' ');
    return spec.is_left() ? text + blanks : blanks + text;
  }

  // A text as the C library's "%s" has it.
  static std::string as_text(const Spec& spec, std::string text) {
    if (spec.has_point) text = text.substr(0, spec.precision_digits());
    return short_enough(filled(spec, text));
  }

  static std::string character(const Spec& spec, const Value& value) {
    need(value, "iulvcb");
    const std::string text =
        short_enough(filled(spec, std::string(1, char(value.number))));
    return text.substr(0, text.find('\0'));
  }

  // Gives an exponent three digits at least.
  static std::string widened(std::string text) {
    const std::size_t e = text.find_first_of("eE");
    if (e == text.npos) return text;
    while (text.size() < e + 5) text.insert(e + 2, "0");
    return text;
  }

  static std::string real_number(const Spec& spec, const Value& value) {
    need(value, "f");
    std::string flags;
    for (const char flag : spec.flags)
      if (flag != '-') flags += flag;
    std::string text = widened(printed(
        "%" + flags + spec.point_and_precision() + spec.letter, value.real));
    if (spec.width.starts_with('0') && !spec.is_left()) {
      const std::size_t sign = is_digit(text[0]) ? 0 : 1;
      while (text.size() < spec.width_digits()) text.insert(sign, "0");
    }
    return short_enough(filled(spec, text));
  }

  static std::string address(const Spec& spec, const Value& value) {
    need(value, "p");
    const bool is_plain = spec.flags.find_first_of(" #+") == spec.flags.npos &&
                          !spec.has_point && !spec.width.starts_with('0');
    if (!is_plain) throw NotTold{};
    return short_enough(filled(spec, address_text(value)));
  }

  // The library's own padding: "#" and "-" in this order, or nothing counts.
  static std::string padded(const Spec& spec, std::string text) {
    std::string flags = spec.flags;
    std::string width = spec.width;
    if (width.starts_with('-')) {
      flags += '-';
      width.erase(0, 1);
    }
    const bool keeps_tail = flags.starts_with('#');
    if (keeps_tail) flags.erase(0, 1);
    const bool is_left = flags.starts_with('-');
    if (is_left) flags.erase(0, 1);
    if (!flags.empty()) return text;
    const std::size_t most =
        spec.has_point ? spec.precision_digits() : text.size();
    if (text.size() > most)
      text =
          keeps_tail ? text.substr(text.size() - most) : text.substr(0, most);
    const std::size_t least = width.empty() ? 0 : std::stoul(width);
    while (text.size() < least) text.insert(is_left ? text.size() : 0, " ");
    return text;
  }

  // Takes a point and one digit away; the digit, or -1 if it is not that.
  static int cut_digit(Spec& spec) {
    if (!spec.has_point || spec.precision.size() != 1) return -1;
    const int digit = spec.precision[0] - '0';
    spec.has_point = false;
    spec.precision.clear();
    return digit;
  }

  static std::string list_of_strings(Spec spec, const Value& value) {
    need(value, "k");
    const int digit = cut_digit(spec);
    return padded(spec, joined(value.texts, digit == 1 ? "\r\n" : " "));
  }

  static std::string moment(Spec spec, const Value& value) {
    need(value, "Mm");
    const int digit = cut_digit(spec);
    if (digit > 5) throw Mistake{};
    return as_text(spec, value.forms[digit < 0 ? 0 : digit]);
  }

  static std::string date(const Spec& spec, const Value& value) {
    need(value, "tM");
    return as_text(spec, value.date);
  }

  // Only a width and a precision stand ahead of the letter of these.
  static bool is_plain(const Spec& spec) {
    return spec.flags.empty() && !spec.width.starts_with('-') && !spec.has_l;
  }

  static bool is_one_of(const Value& value, std::string_view tags) {
    return value.tag >= 32 &&
           tags.find(static_cast<char>(value.tag)) != tags.npos;
  }

  static std::string by_template(const Spec& spec, const Value& value) {
    const bool fits = is_one_of(value, "tMm");
    if (!is_plain(spec) && !fits) throw NotTold{};
    if (!is_plain(spec)) throw Mistake{};
    if (!fits) throw BadDirective{};
    return padded(spec, strftime_text(*spec.bracket, value.fields));
  }

  static std::string strftime_text(const std::string& form,
                                   const std::tm& fields) {
    constexpr std::string_view k_letters = "aAbBcdHIjmMpSUwWxXyYZ%";
    for (std::size_t i = 0; i < form.size(); ++i) {
      if (form[i] != '%') continue;
      if (++i == form.size()) return "";
      if (k_letters.find(form[i]) == k_letters.npos) return "";
    }
    char text[80];
    return std::string(text,
                       std::strftime(text, sizeof text, form.c_str(), &fields));
  }

  static std::string picture(const Spec& spec, const Value& value) {
    const bool fits = is_one_of(value, "bcfiluv");
    if (!is_plain(spec) && !fits) throw NotTold{};
    if (!is_plain(spec)) throw Mistake{};
    if (!fits) throw BadDirective{};
    const auto found = value.pictures.find(spec.bracket.value_or(","));
    if (found == value.pictures.end() || !spec.width.empty() || spec.has_point)
      throw NotTold{};
    return found->second;
  }

  // ---- "$" escapes

  void take_table() {
    if (args.empty() || args[0].tag != 3) return;
    table = args[0].table;
    args.erase(args.begin());
  }

  std::size_t read_count() {
    const std::string text = digits();
    return text.empty() ? 0 : std::stoul(text);
  }

  void escape() {
    const char c = next();
    if (is_digit(c)) {
      out += world.groups[static_cast<std::size_t>(c - '0')];
      return;
    }
    switch (c) {
      case '`':
        out += world.groups[10];
        break;
      case '\'':
        out += world.groups[11];
        break;
      case 'T':
        out += world.now_3;
        break;
      case 'd':
        out += world.now_1;
        break;
      case 't':
        out += world.now_2;
        break;
      case 'M':
        break;
      case 'c':
        cut();
        break;
      case 's':
        fill();
        break;
      case 'r':
        repeat();
        break;
      case '%':
      case '{':
        reference(c == '%' ? '%' : '}');
        break;
      default:
        throw BadDirective{};
    }
  }

  void cut() {
    const std::size_t count = read_count();
    out = out.substr(0, count == 0 ? 79 : count);
  }

  void fill() {
    std::size_t column = read_count();
    if (column == 0) column = (out.size() / 10 + 1) * 10;
    while (out.size() < column) out += ' ';
  }

  void repeat() {
    std::string text;
    do {
      if (byte() == '\0') throw BadDirective{};
      text += next();
    } while (!is_digit(byte()));
    for (std::size_t count = read_count(); count > 0; --count) out += text;
  }

  void reference(char closing) {
    const char c = byte();
    if (c == '*' || c == '-' || is_digit(c)) {
      next();
      out += of_the_program(c);
      return;
    }
    std::string name;
    while (is_digit(byte()) || is_letter(byte()) || byte() == '_')
      name += next();
    if (byte() == closing) next();
    out += looked_up(name);
  }

  static bool is_letter(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
  }

  std::string of_the_program(char c) const {
    if (c == '*') return joined(world.program_args, " ");
    if (c == '0') return world.program_path;
    if (c == '-') return world.program_name;
    const auto number = static_cast<std::size_t>(c - '0');
    return number <= world.program_args.size() ? world.program_args[number - 1]
                                               : "";
  }

  std::string looked_up(std::string name) const {
    if (table == nullptr)
      for (char& c : name)
        if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 32);
    const auto& names = table != nullptr ? *table : world.variables;
    const auto found = names.find(name);
    return found == names.end() ? "" : found->second;
  }

  const std::string format;
  std::vector<Value> args;
  World& world;
  const std::map<std::string, std::string>* table;
  std::size_t at = 0;
  std::size_t mark = 0;
  std::size_t room = 0;
  std::string out;
};

}  // namespace format_model

#endif  // TESTS_ZXLIB_FORMAT_MODEL_H
