// pages.cpp - the pages in docs/, for tests of their examples.
#include "kit/pages.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <sstream>

#include "kit/tempdir.h"

namespace kit {
namespace {

std::string trimmed(const std::string& text) {
  const std::size_t first = text.find_first_not_of(' ');
  if (first == text.npos) return "";
  return text.substr(first, text.find_last_not_of(' ') - first + 1);
}

// The parts of a text between separators; behind the last one there is none.
std::vector<std::string> parts_of(const std::string& text, char separator) {
  std::istringstream in(text);
  std::vector<std::string> parts;
  for (std::string part; std::getline(in, part, separator);)
    parts.push_back(part);
  return parts;
}

}  // namespace

std::string source(const std::string& name) {
  const char* const folder = std::getenv("ZX_SOURCE_DIR");
  if (folder == nullptr) ADD_FAILURE() << "ZX_SOURCE_DIR is not set";
  return std::string(folder == nullptr ? "." : folder) + "/" + name;
}

std::vector<std::string> lines_of(const std::string& name) {
  return parts_of(read_file(source(name)), '\n');
}

std::vector<std::vector<std::string>> rows_in(const std::string& page) {
  std::vector<std::vector<std::string>> rows;
  for (const std::string& line : lines_of(page)) {
    if (!line.starts_with("| ")) continue;
    std::vector<std::string>& cells = rows.emplace_back();
    for (std::string cell : parts_of(line.substr(1), '|')) {
      std::erase(cell, '`');
      cells.push_back(trimmed(cell));
    }
  }
  return rows;
}

std::string indented_in(const std::string& page) {
  constexpr std::size_t k_indent = 4;
  std::string text;
  for (const std::string& line : lines_of(page))
    if (line.starts_with("    ")) text += line.substr(k_indent) + "\n";
  return text;
}

}  // namespace kit
