// hebrew_model.h - a second Hebrew reordering for the tests: slow, obvious,
// written from the rules alone, a function for each rule.
//
// It shares nothing with zxlib/zxp2l.cpp.  Text is std::string; a line that
// must fail an assertion gives no value.
#ifndef HEBREW_MODEL_H
#define HEBREW_MODEL_H

#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace hebrew_model {

using Text = std::string;
using Maybe = std::optional<Text>;

inline constexpr unsigned char k_ltr_mark = 253;
inline constexpr unsigned char k_rtl_mark = 254;

inline unsigned char byte_at(const Text& text, std::size_t i) {
  return static_cast<unsigned char>(text[i]);
}

inline bool is_hebrew(unsigned char c) { return c >= 224 && c <= 250; }
inline bool is_latin(unsigned char c) {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}
inline bool is_digit(unsigned char c) { return c >= '0' && c <= '9'; }
inline bool is_mark(unsigned char c) {
  return c == k_ltr_mark || c == k_rtl_mark;
}
inline bool is_strong(unsigned char c) {
  return is_hebrew(c) || is_latin(c) || is_mark(c);
}
inline bool is_separator(unsigned char c) {
  return c == ',' || c == '/' || c == ':' || c == '+' || c == '-' || c == '.' ||
         c == '$';
}

inline unsigned char exchanged(unsigned char c) {
  if (c == '(') return ')';
  if (c == ')') return '(';
  if (c == '[') return ']';
  if (c == ']') return '[';
  if (c == '{') return '}';
  if (c == '}') return '{';
  return c;
}

inline Text to_1255(Text text) {
  for (char& c : text) {
    const auto value = static_cast<unsigned char>(c);
    if (value >= 128 && value <= 154) c = static_cast<char>(value + 96);
  }
  return text;
}

inline Text to_862(Text text) {
  for (char& c : text) {
    const auto value = static_cast<unsigned char>(c);
    if (is_hebrew(value)) c = static_cast<char>(value - 96);
  }
  return text;
}

// ---- runs

struct Run {
  bool rtl;
  std::size_t length;
};

inline Run split_run(const Text& text, bool base) {
  // The first strong byte; without one the run is the whole text.
  std::size_t first = 0;
  while (first < text.size() && !is_strong(byte_at(text, first))) ++first;
  if (first == text.size()) return {base, text.size()};

  const unsigned char strong = byte_at(text, first);
  const bool rtl = is_hebrew(strong) || strong == k_rtl_mark;

  // Neutrals ahead of another direction are a run of their own.
  if (rtl != base && first > 0) return {base, first};

  // Up to the first strong byte of the other direction.
  std::size_t end = first;
  for (; end < text.size(); ++end) {
    const unsigned char c = byte_at(text, end);
    if (rtl && (is_latin(c) || c == k_ltr_mark)) break;
    if (!rtl && (is_hebrew(c) || c == k_rtl_mark)) break;
  }

  // Trailing neutrals are given back.
  if (rtl != base)
    for (; end > 0; --end) {
      const unsigned char before = byte_at(text, end - 1);
      if (is_digit(before) || is_strong(before)) break;
    }
  return {rtl, end};
}

// ---- reversing

// Windows 95 has percent signs that belong to no number.
enum class System { any, windows_95 };

inline Text reverse_run(const Text& source, bool mark, System system) {
  Text out;
  int at = static_cast<int>(source.size()) - 1;
  const auto byte = [&](int i) {
    return byte_at(source, static_cast<std::size_t>(i));
  };
  while (at >= 0) {
    if (byte(at) == k_rtl_mark) {
      --at;
      continue;
    }
    const bool percent = system != System::windows_95 && byte(at) == '%' &&
                         at >= 1 && is_digit(byte(at - 1));
    if (!is_digit(byte(at)) && !percent) {
      out += static_cast<char>(exchanged(byte(at)));
      --at;
      continue;
    }

    // `at` ends a number; `next` is the byte that the walk looks at.
    int next = at - 1;
    while (next >= 0) {
      const bool joins =
          is_digit(byte(next)) ||
          (is_separator(byte(next)) && next >= 1 && is_digit(byte(next - 1)));
      if (!joins) break;
      --next;
    }
    if (next >= 1 && byte(next) == '$') --next;
    const int first = next + 1;

    if (mark && !out.empty() && out.back() == '$' && is_digit(byte(first)))
      out += static_cast<char>(k_rtl_mark);
    if (at - first + 1 >= 2)
      out += source.substr(static_cast<std::size_t>(first),
                           static_cast<std::size_t>(at - first + 1));
    else
      out += static_cast<char>(exchanged(byte(at)));
    at = next;
  }
  return out;
}

// ---- lines

// True if the first digit or Hebrew letter of a text is a digit.
inline bool leads_with_digit(const Text& text) {
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (is_digit(byte_at(text, i))) return true;
    if (is_hebrew(byte_at(text, i))) return false;
  }
  return false;
}

inline Maybe logical_from_phys(const Text& text, bool base,
                               System system = System::any) {
  Text rest = to_1255(text);
  Text output;
  while (!rest.empty()) {
    Run run = split_run(rest, base);
    if (run.rtl != base) {
      for (; run.length > 0; --run.length) {
        const unsigned char last = byte_at(rest, run.length - 1);
        if (run.rtl ? is_hebrew(last) : is_latin(last)) break;
      }
      if (run.length == 0) return {};
    }
    Text piece = rest.substr(0, run.length);
    rest = rest.substr(run.length);
    if (run.rtl) piece = reverse_run(piece, true, system);

    if (output.empty() && rest.empty()) {
      output = piece;
    } else if (base) {
      if (!run.rtl && leads_with_digit(output))
        piece += static_cast<char>(k_rtl_mark);
      output = piece + output;
    } else {
      if (!run.rtl && leads_with_digit(piece) && !output.empty())
        output += static_cast<char>(k_ltr_mark);
      output = output + piece;
    }
  }
  return output;
}

inline Text phys_from_logical(const Text& text, bool base,
                              System system = System::any) {
  Text rest = text;
  Text output;
  while (!rest.empty()) {
    const Run run = split_run(rest, base);
    const Text source = rest.substr(0, run.length);
    rest = rest.substr(run.length);
    Text piece;
    if (run.rtl) {
      piece = reverse_run(source, false, system);
    } else {
      for (const char c : source)
        if (static_cast<unsigned char>(c) != k_ltr_mark) piece += c;
    }
    output = base ? piece + output : output + piece;
  }
  return to_862(output);
}

// Splits at CR LF, converts each line, joins with CR LF.
template <class Convert>
Maybe by_lines(const Text& text, Convert convert) {
  Text result;
  std::size_t start = 0;
  for (;;) {
    const std::size_t end = text.find("\r\n", start);
    const Maybe line = convert(
        text.substr(start, end == Text::npos ? Text::npos : end - start));
    if (!line) return {};
    result += *line;
    if (end == Text::npos) return result;
    result += "\r\n";
    start = end + 2;
  }
}

inline Maybe logical_from_phys_lines(const Text& text, bool base,
                                     System system = System::any) {
  return by_lines(text, [&](const Text& line) {
    return logical_from_phys(line, base, system);
  });
}

inline Maybe phys_from_logical_lines(const Text& text, bool base,
                                     System system = System::any) {
  return by_lines(text, [&](const Text& line) {
    return Maybe(phys_from_logical(line, base, system));
  });
}

// ---- Unicode

// A code point of up to 16 bits in UTF-8.
inline Text utf8_of(unsigned code) {
  const auto c = [](unsigned value) { return static_cast<char>(value); };
  if (code < 0x80) return {c(code)};
  if (code < 0x800) return {c(0xC0 + code / 64), c(0x80 + code % 64)};
  return {c(0xE0 + code / 4096), c(0x80 + code / 64 % 64), c(0x80 + code % 64)};
}

// The code points of a text whose alef is this byte.
inline std::vector<unsigned> codes_of(const Text& text, unsigned alef) {
  std::vector<unsigned> codes;
  for (const char c : text) {
    const auto value = static_cast<unsigned char>(c);
    const unsigned code = value < 128 ? value : value + 1488U - alef;
    if (code < 1515) codes.push_back(code);
  }
  return codes;
}

inline Text ansi_to_utf8(const Text& text) {
  Text result;
  for (const unsigned code : codes_of(text, 224)) result += utf8_of(code);
  return result;
}

// Units of two bytes, the low one first.
inline Text to_utf16(const Text& text, unsigned alef) {
  Text result;
  for (const unsigned code : codes_of(text, alef)) {
    result += static_cast<char>(code % 256);
    result += static_cast<char>(code / 256);
  }
  return result;
}
inline Text ansi_to_utf16(const Text& text) { return to_utf16(text, 224); }
inline Text dos_to_utf16(const Text& text) { return to_utf16(text, 128); }

// What a target file gets of physical text: without the dropped bytes, which
// are ASCII.
inline Maybe exported(const Text& text, const Text& dropped,
                      System system = System::any) {
  const Maybe logical = logical_from_phys_lines(text, true, system);
  if (!logical) return {};
  Text result;
  for (const char c : ansi_to_utf8(*logical))
    if (dropped.find(c) == Text::npos) result += c;
  return result;
}

}  // namespace hebrew_model

#endif  // HEBREW_MODEL_H
