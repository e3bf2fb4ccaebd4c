// unescape.cpp - the fuzz target of what reads strings: escapes, numbers,
// searches, checksums.
//
// An input is SIZE, `SIZE modulo 8` bytes that are looked for, and a text of
// any bytes.  Results must agree with the standard library's, or with each
// other.
#include <bit>
#include <charconv>
#include <string>
#include <string_view>

#include "fuzz/input.h"
#include "fuzz/targets.h"
#include "zxstr2.h"

namespace fuzz {
namespace {

constexpr std::size_t k_longest_text = 300;

bool is_digit(char byte) { return byte >= '0' && byte <= '9'; }

// ---- escapes

bool needs_escape(std::string_view text, bool tilde) {
  for (const char byte : text)
    if ((byte >= 0 && byte < 32) || byte == '"' || byte == '\'' ||
        byte == '\\' || (tilde && byte == '~'))
      return true;
  return false;
}

void escape_and_back(const zxStr& text) {
  for (const bool tilde : {true, false}) {
    const zxStr escaped = escape(text, tilde);
    require(std_str(::unescape(escaped)) == text.view(),
            "a text does not come back from its escapes");
    for (const char byte : escaped.view())
      require(byte < 0 || byte >= 32, "a control character stays");
    require(
        (escaped.view() == text.view()) == !needs_escape(text.view(), tilde),
        "too much is escaped, or too little");
  }
  const zxStr read = ::unescape(text);
  require(read.length() <= text.length(), "reading escapes adds bytes");
  require(text.view().find('\\') != std::string_view::npos ||
              read.view() == text.view(),
          "a text without escapes has changed");
}

// ---- numbers

// True for a text of a sign and 1 to `most` digits.
bool is_whole(std::string_view text, std::size_t most) {
  if (text.starts_with('-')) text.remove_prefix(1);
  if (text.empty() || text.size() > most) return false;
  for (const char byte : text)
    if (!is_digit(byte)) return false;
  return true;
}

std::size_t digits_at(std::string_view text, std::size_t at) {
  std::size_t end = at;
  while (end < text.size() && is_digit(text[end])) ++end;
  return end - at;
}

// True for digits, a point and digits, e with a sign and digits: what every
// reader of numbers takes.
bool is_plain_real(std::string_view text) {
  std::size_t at = text.starts_with('-') ? 1 : 0;
  std::size_t count = digits_at(text, at);
  if (count == 0) return false;
  at += count;
  if (at < text.size() && text[at] == '.') {
    count = digits_at(text, ++at);
    if (count == 0) return false;
    at += count;
  }
  if (at == text.size()) return true;
  if (text[at] != 'e' && text[at] != 'E') return false;
  ++at;
  if (at < text.size() && (text[at] == '-' || text[at] == '+')) ++at;
  count = digits_at(text, at);
  return count > 0 && at + count == text.size();
}

template <class Value, class... How>
Value read(std::string_view text, bool& is_in_range, How... how) {
  Value value = 0;
  const auto result =
      std::from_chars(text.data(), text.data() + text.size(), value, how...);
  is_in_range = result.ec == std::errc();
  return value;
}

// Reads numbers of a text that ends where its memory ends, and once more
// with white space around it.
void read_numbers(std::string_view bytes) {
  const Text text(bytes);
  const Text wide("\t " + std::string(bytes) + "\r\n ");
  bool is_in_range = false;

  const std::int32_t whole = parse_long(text.view());
  require(parse_long(wide.view()) == whole, "white space changes a number");
  if (is_whole(bytes, 9))
    require(whole == read<std::int32_t>(bytes, is_in_range), "parse_long");

  const double real = parse_double(text.view());
  require(real == real, "a number is none");
  require(std::bit_cast<std::uint64_t>(parse_double(wide.view())) ==
              std::bit_cast<std::uint64_t>(real),
          "white space changes a double");
  if (is_plain_real(bytes)) {
    const double expected = read<double>(bytes, is_in_range);
    require(!is_in_range || real == expected, "parse_double");
  }

  const std::uint32_t word = parse_hex(text.view());
  require(parse_hex(zxStr("  " + std::string(bytes))) == word,
          "blanks change a word");
  if (!bytes.empty() && bytes.size() <= 8 &&
      bytes.find_first_not_of("0123456789abcdefABCDEF") == bytes.npos)
    require(word == read<std::uint32_t>(bytes, is_in_range, 16), "parse_hex");
}

// ---- searches

// What find() should give.
std::int32_t place_of(std::string_view text, std::int32_t from,
                      std::string_view what) {
  const auto start = static_cast<std::size_t>(from);
  if (start >= text.size()) return -1;
  const std::size_t place = text.find(what, start);
  return place == text.npos ? -1 : static_cast<std::int32_t>(place);
}

std::string folded(std::string_view text) {
  std::string result(text);
  for (char& byte : result)
    if (byte >= 'A' && byte <= 'Z') byte = static_cast<char>(byte + 32);
  return result;
}

// Without regard to case and up to a NUL that both have.
bool alike(std::string_view a, std::string_view b) {
  const std::string x = folded(a);
  const std::string y = folded(b);
  for (std::size_t i = 0; i < x.size(); ++i) {
    if (x[i] != y[i]) return false;
    if (x[i] == '\0') return true;
  }
  return true;
}

void compare_ends(std::string_view text, std::string_view what) {
  const bool fits = what.size() <= text.size();
  require(starts_with(text, what) == text.starts_with(what), "starts_with");
  require(ends_with(text, what) == text.ends_with(what), "ends_with");
  require(istarts_with(text, what) ==
              (fits && alike(text.substr(0, what.size()), what)),
          "istarts_with");
  require(iends_with(text, what) ==
              (fits && alike(text.substr(text.size() - what.size()), what)),
          "iends_with");
}

void search(const Text& text, const Text& what) {
  const auto end = static_cast<std::int32_t>(text.view().size()) + 2;
  for (std::int32_t from = 0; from < end; ++from) {
    require(find(text.view(), from, what.view()) ==
                place_of(text.view(), from, what.view()),
            "find");
    if (!what.view().empty())
      require(find_char(text.view(), from, what.view()[0]) ==
                  place_of(text.view(), from, what.view().substr(0, 1)),
              "find_char");
  }
  require(find(text.view(), what.view()) == find(text.view(), 0, what.view()) &&
              contains(text.view(), what.view()) ==
                  (find(text.view(), what.view()) >= 0),
          "contains");
  compare_ends(text.view(), what.view());
}

// ---- parts and case

void take_parts(const zxStr& text, std::int32_t position, std::int32_t length) {
  const std::string_view view = text.view();
  const std::size_t start =
      position < 0 ? 0
                   : std::min(static_cast<std::size_t>(position), view.size());
  const std::size_t size = length < 0 ? 0 : static_cast<std::size_t>(length);
  require(std_str(sub(text, position, length)) == view.substr(start, size),
          "sub");
  require(std_str(from(text, position)) == view.substr(start), "from");
  if (position >= 0 && position <= text.length())
    require(std_str(rest(text, position)) == view.substr(start), "rest");
}

void change_case(const zxStr& text) {
  const zxStr low = lowered(text);
  const zxStr high = uppered(text);
  require(low.view() == folded(text.view()), "lowered");
  require(folded(high.view()) == low.view() &&
              std_str(uppered(low)) == high.view() &&
              std_str(lowered(high)) == low.view(),
          "uppered");
}

// ---- checksums

void sum_up(std::string_view text) {
  const std::uint32_t whole = crc32(text.data(), text.size());
  const std::size_t half = text.size() / 3;
  require(crc32_add(crc32(text.data(), half), text.data() + half,
                    text.size() - half) == whole,
          "the checksum in two parts");
  std::uint32_t by_bytes = crc32("", 0);
  for (const char byte : text)
    by_bytes = crc32_byte(by_bytes, static_cast<std::uint8_t>(byte));
  require(by_bytes == whole, "the checksum by bytes");
}

}  // namespace

void unescape(Bytes input) {
  Reader reader(input);
  const std::uint8_t size = reader.byte();
  const Text what(reader.text(size % 8U));
  const Text text(reader.text(k_longest_text));
  const zxStr string(text.view());
  escape_and_back(string);
  read_numbers(text.view());
  search(text, what);
  take_parts(string, size - 20, static_cast<std::int32_t>(size) / 3 - 5);
  change_case(string);
  sum_up(text.view());
  require(string.view() == text.view(), "the text has changed");
}

}  // namespace fuzz
