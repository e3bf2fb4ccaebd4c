// patterns.cpp - the fuzz target of the pattern engine.
//
// An input is two bytes and three texts,
//
//   COUNT PREVIOUS pattern LF LF replacement LF LF subject
//
// where the first two line feeds in a row end the pattern and the next two
// the replacement; what is missing is empty.  COUNT gives, modulo 8, how many
// searches a replacement may take.  PREVIOUS is the byte ahead of the subject
// when a search goes on behind an earlier match.
//
// Beside staying within memory, the results must agree with each other: the
// same search by another road, with its filters off or begun further right
// finds the same.
#include <algorithm>
#include <array>
#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "fuzz/input.h"
#include "fuzz/targets.h"
#include "zxregexc.h"
#include "zxregexe.h"
#include "zxstrm.h"
#include "zxstrm2.h"

namespace fuzz {
namespace {

// Small enough that no pattern is refused for its size and the slowest search
// takes a moment only.
constexpr std::size_t k_longest_pattern = 120;
constexpr std::size_t k_longest_replacement = 40;
constexpr std::size_t k_longest_subject = 200;

// ---- the input

struct Input {
  std::int32_t count = 1;
  char previous = 0;
  std::string_view pattern, replacement, subject;
};

std::string_view cut_part(std::string_view& rest) {
  constexpr std::string_view k_separator = "\n\n";
  const std::size_t place = rest.find(k_separator);
  const std::string_view part = rest.substr(0, place);
  rest.remove_prefix(std::min(rest.size(), part.size() + k_separator.size()));
  return part;
}

Input input_of(Bytes bytes) {
  constexpr std::size_t k_head = 2;
  constexpr int k_counts = 8;
  Input input;
  if (bytes.size() < k_head) return input;
  input.count = 1 + bytes[0] % k_counts;
  input.previous = static_cast<char>(bytes[1]);
  std::string_view rest(reinterpret_cast<const char*>(bytes.data()),
                        bytes.size());
  rest.remove_prefix(k_head);
  input.pattern = cut_part(rest).substr(0, k_longest_pattern);
  input.replacement = cut_part(rest).substr(0, k_longest_replacement);
  input.subject = rest.substr(0, k_longest_subject);
  return input;
}

// ---- programs

struct Free {
  void operator()(zxRegex* regex) const { zx_realloc(regex, 0); }
};
using Program = std::unique_ptr<zxRegex, Free>;

// The nodes of a program, as "STAR -> 9" of the line "4 STAR -> 9".
std::vector<std::string_view> nodes_in(std::string_view dump) {
  std::vector<std::string_view> nodes;
  while (!dump.empty()) {
    const std::string_view line = dump.substr(0, dump.find('\n'));
    dump.remove_prefix(std::min(dump.size(), line.size() + 1));
    const std::size_t place = line.find_first_not_of("0123456789");
    if (place != 0 && place != line.npos)
      nodes.push_back(line.substr(place + 1));
  }
  return nodes;
}

bool any_begins_with(const std::vector<std::string_view>& nodes,
                     std::string_view text) {
  return std::any_of(nodes.begin(), nodes.end(), [=](std::string_view node) {
    return node.starts_with(text);
  });
}

// Patterns that refer back to groups, or repeat groups that may be empty, try
// all ways there are.  The longest subject for which these are not too many.
std::size_t longest_subject(std::string_view dump) {
  constexpr std::array<std::string_view, 4> k_choices = {"BRANCH", "STAR",
                                                         "PLUS", "CURLY"};
  const std::vector<std::string_view> nodes = nodes_in(dump);
  const bool has_empty_passes =
      any_begins_with(nodes, "BACK ") && (any_begins_with(nodes, "CURLY 0") ||
                                          any_begins_with(nodes, "CURLYMIN 0"));
  if (!has_empty_passes && !any_begins_with(nodes, "BACKREF"))
    return k_longest_subject;
  const auto choices =
      std::count_if(nodes.begin(), nodes.end(), [&](std::string_view node) {
        return std::any_of(
            k_choices.begin(), k_choices.end(),
            [=](std::string_view name) { return node.starts_with(name); });
      });
  return choices <= 2 ? 40 : choices <= 4 ? 16 : choices <= 12 ? 6 : 3;
}

// ---- results

volatile unsigned touched;

void touch(const char* start, const char* end) {
  for (; start != end; ++start)
    touched = touched + static_cast<unsigned char>(*start);
}

bool lies_within(const char* start, const char* end, const char* from,
                 const char* to) {
  return from <= start && start <= end && end <= to;
}

void check_found(const char* subject, const char* end) {
  const zxMatch& m = zx_match;
  require(m.start[0] != nullptr && m.start[zxMatch::k_before] == subject &&
              m.end[zxMatch::k_before] == m.start[0] &&
              m.start[zxMatch::k_after] == m.end[0] &&
              m.end[zxMatch::k_after] == end,
          "the match and what is around it are not the subject");
  for (int n = 0; n < zxMatch::k_slots; ++n) {
    require((m.start[n] == nullptr) == (m.end[n] == nullptr),
            "half a group is set");
    if (m.start[n] == nullptr) continue;
    require(lies_within(m.start[n], m.end[n], subject, end),
            "a group is not of the subject");
    touch(m.start[n], m.end[n]);
  }
  for (const zxMatch::Field& field : m.field) {
    if (field.type == 0) continue;
    require(std::string_view("dxfvstC").find(field.type) !=
                    std::string_view::npos &&
                lies_within(field.start, field.end, subject, end),
            "a field is not of the subject");
    touch(field.start, field.end);
  }
}

void check_not_found() {
  for (int n = 0; n < zxMatch::k_slots; ++n)
    require(zx_match.start[n] == nullptr && zx_match.end[n] == nullptr,
            "a group is left without a match");
}

// What a search found, as places in the subject: empty if nothing.
using Places = std::vector<std::ptrdiff_t>;

Places places_found(const char* subject) {
  const auto place = [&](const char* p) {
    return p == nullptr ? -1 : p - subject;
  };
  Places places;
  for (int n = 0; n < zxMatch::k_before; ++n) {
    places.push_back(place(zx_match.start[n]));
    places.push_back(place(zx_match.end[n]));
  }
  for (const zxMatch::Field& field : zx_match.field) {
    places.push_back(field.type);
    places.push_back(field.type == 0 ? -1 : place(field.start));
    places.push_back(field.type == 0 ? -1 : place(field.end));
  }
  return places;
}

Places result_of(bool found, const char* subject, const char* end) {
  if (!found) {
    check_not_found();
    return {};
  }
  check_found(subject, end);
  return places_found(subject);
}

Places search(const zxRegex& regex, const char* subject, const char* end) {
  clear_match();
  return result_of(regexec(&regex, subject, end), subject, end);
}

// Of the rest of a subject, from `from` on.
Places search_on(const zxRegex& regex, const char* subject, const char* from,
                 const char* end, char previous) {
  clear_match();
  const bool found = regexec_from(&regex, from, end, previous);
  if (found) check_found(from, end);
  return found ? places_found(subject) : Places();
}

// ---- what must agree

// The filters only save time.
void compare_without_filters(zxRegex& regex, const Text& subject,
                             const Places& expected) {
  if (regex.reganch == 0) regex.regstart = k_regex_no_start;
  regex.regmust = nullptr;
  regex.regmlen = 0;
  require(search(regex, subject.begin(), subject.end()) == expected,
          "a filter changes the result");
}

// A search that begins further right, up to the match, finds the same match.
void compare_further_right(const zxRegex& regex, const Text& subject,
                           const Places& expected) {
  constexpr std::ptrdiff_t k_most = 16;
  std::ptrdiff_t last = subject.end() - subject.begin();
  if (!expected.empty()) last = expected[0];
  for (std::ptrdiff_t n = 1; n <= std::min(last, k_most); ++n) {
    const char* const from = subject.begin() + n;
    require(search_on(regex, subject.begin(), from, subject.end(), from[-1]) ==
                expected,
            "a search that begins further right finds something else");
  }
}

void run_program(zxRegex& regex, const Input& input, const Text& subject) {
  const Places places = search(regex, subject.begin(), subject.end());
  require(search(regex, subject.begin(), subject.end()) == places,
          "the same search finds something else");
  search_on(regex, subject.begin(), subject.begin(), subject.end(),
            input.previous);
  if (regex.reganch == 0) compare_further_right(regex, subject, places);
  compare_without_filters(regex, subject, places);
}

// ---- the string level

std::string folded(std::string_view text) {
  std::string result(text);
  for (char& byte : result)
    if (byte >= 'A' && byte <= 'Z') byte = static_cast<char>(byte - 'A' + 'a');
  return result;
}

void touch_groups() {
  for (int n = 0; n < zxMatch::k_slots; ++n) {
    const zxStr text = group_text(n);
    require(text.length() == group_length(n), "a group has two lengths");
    touch(text.begin(), text.end());
    alternative(n);
  }
  for (int n = 1; n <= k_regex_fields; ++n) {
    const zxStr text = field_text(n);
    touch(text.begin(), text.end());
    field_type(n);
  }
}

Places places_by_strings(bool found) {
  if (!found) return {};
  touch_groups();
  return places_found(zx_match.start[zxMatch::k_before]);
}

void match_strings(const zxRegex& regex, const zxStr& pattern,
                   std::string_view text) {
  const zxStr subject(text);
  const Text plain(text);
  const Text small(folded(text));
  require(places_by_strings(match(subject, pattern)) ==
              search(regex, plain.begin(), plain.end()),
          "a search of a string finds something else");
  require(places_by_strings(imatch(subject, pattern)) ==
              search(regex, small.begin(), small.end()),
          "a caseless search finds something else");
}

void replace_in(const Input& input, std::string_view text) {
  const Text pattern(input.pattern);
  const Text replacement(input.replacement);
  zxStr subject(text);
  forget(pattern.begin());
  const std::int32_t done = replace_n(
      subject, pattern.begin(), static_cast<std::int32_t>(input.pattern.size()),
      replacement.begin(), static_cast<std::int32_t>(input.replacement.size()),
      input.count);
  forget(pattern.begin());
  require(0 <= done && done <= input.count, "replaced more often than told");
  require(done > 0 || subject.view() == text, "replaced nothing, yet changed");
  touch(subject.begin(), subject.end());
}

void cut_up(const zxStr& pattern, std::string_view text) {
  zxStr rest(text);
  zxStr piece;
  for (std::int32_t before = rest.length(); before > 0;) {
    require(cut_first(rest, piece, pattern), "nothing is cut off");
    require(piece.length() + rest.length() <= before, "a cut adds to it");
    require(rest.length() < before, "a cut takes nothing away");
    before = rest.length();
  }
  require(!cut_first(rest, piece, pattern), "something is cut off nothing");
}

}  // namespace

void patterns(Bytes bytes) {
  const Input input = input_of(bytes);
  const Text pattern(input.pattern);
  const zxStr pattern_string(input.pattern);
  const bool valid = regcheck(pattern.begin(), pattern.end());
  require(check_pattern(pattern_string) == valid, "two answers on a pattern");
  if (!valid) return;

  const Program regex(regcomp(pattern.begin(), pattern.end()));
  require(regex_is_sound(*regex), "the program is not sound");
  const zxStr dump = regex_dump(*regex);
  const std::string_view subject =
      input.subject.substr(0, longest_subject(dump.view()));
  match_strings(*regex, pattern_string, subject);
  replace_in(input, subject);
  cut_up(pattern_string, subject);
  run_program(*regex, input, Text(subject));
  clear_match();
  forget(pattern_string.c_str());
}

}  // namespace fuzz
