// text_numbers.cpp - numbers read from text: ours, std::from_chars and the C
// library.
#include <algorithm>
#include <charconv>
#include <cstdio>
#include <cstdlib>

#include "text.h"
#include "zxstr2.h"

namespace text {
namespace {

// ---- what is read

template <class Value>
std::vector<std::string> printed(const char* format,
                                 const std::vector<Value>& values) {
  std::vector<std::string> texts;
  for (const Value value : values) {
    char room[64];
    std::snprintf(room, sizeof room, format, value);
    texts.emplace_back(room);
  }
  return texts;
}

const std::vector<std::string>& int_texts() {
  static const auto list = printed("%d", ints());
  return list;
}

const std::vector<std::string>& double_texts() {
  static const auto list = printed("%.15g", doubles());
  return list;
}

// As people write them: commas between thousands and blanks around.
std::vector<std::string> written(std::vector<std::string> texts) {
  for (std::string& text : texts) {
    const std::size_t first = text[0] == '-' ? 1 : 0;
    std::size_t place = std::min(text.find('.'), text.size());
    while (place > first + 3) text.insert(place -= 3, ",");
    text.insert(0, "  ").append(" ");
  }
  return texts;
}

// ---- ours

const std::vector<zxStr>& our_int_texts() {
  static const auto list = ours(int_texts());
  return list;
}
const std::vector<zxStr>& our_double_texts() {
  static const auto list = ours(double_texts());
  return list;
}
const std::vector<zxStr>& written_ints() {
  static const auto list = ours(written(int_texts()));
  return list;
}
const std::vector<zxStr>& written_doubles() {
  static const auto list = ours(written(double_texts()));
  return list;
}

std::int32_t our_int(std::size_t i) { return parse_long(our_int_texts()[i]); }
double our_double(std::size_t i) { return parse_double(our_double_texts()[i]); }
std::int32_t written_int(std::size_t i) {
  return parse_long(written_ints()[i]);
}
double written_double(std::size_t i) {
  return parse_double(written_doubles()[i]);
}

// ---- theirs

template <class Value>
Value read(const std::string& text) {
  Value value = 0;
  std::from_chars(text.data(), text.data() + text.size(), value);
  return value;
}

std::int32_t from_chars_int(std::size_t i) {
  return read<std::int32_t>(int_texts()[i]);
}
double from_chars_double(std::size_t i) {
  return read<double>(double_texts()[i]);
}

std::int32_t c_int(std::size_t i) {
  return static_cast<std::int32_t>(
      std::strtol(int_texts()[i].c_str(), nullptr, 10));
}
double c_double(std::size_t i) {
  return std::strtod(double_texts()[i].c_str(), nullptr);
}

}  // namespace

void add_numbers() {
  add<our_int>("parse_long", "ours");
  add<from_chars_int>("parse_long", "from_chars");
  add<c_int>("parse_long", "strtol");
  add<written_int>("parse_long", "written");
  add<our_double>("parse_double", "ours");
  add<from_chars_double>("parse_double", "from_chars");
  add<c_double>("parse_double", "strtod");
  add<written_double>("parse_double", "written");
}

}  // namespace text
