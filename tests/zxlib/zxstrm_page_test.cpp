// zxstrm_page_test.cpp - the examples of docs/patterns.md.
// Tests zxlib/zxregexc.h, zxregexe.h, zxstrm.h and zxstrm2.h.
//
// The page's examples are indented blocks of columns, two blanks apart.  The
// names in the first line say what is compared.
#include <gtest/gtest.h>

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "kit/pages.h"
#include "kit/text.h"
#include "zxstrm.h"
#include "zxstrm2.h"

namespace {

using Cells = std::vector<std::string>;
using Example = std::map<std::string, std::string>;

constexpr char k_page[] = "docs/patterns.md";

// Where the cell at the start of the text ends.  Blanks in quotes are a part
// of it; a quote is one only in cells that begin with it.
std::size_t cell_length(std::string_view text) {
  const bool is_quoted = text.starts_with('"');
  bool inside = false;
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (is_quoted && inside && text[i] == '\\')
      ++i;
    else if (is_quoted && text[i] == '"')
      inside = !inside;
    else if (!inside && text.substr(i).starts_with("  "))
      return i;
  }
  return text.size();
}

Cells columns_of(std::string_view line) {
  Cells cells;
  while (!line.empty()) {
    const std::size_t length = cell_length(line);
    cells.emplace_back(line.substr(0, length));
    const std::size_t next = line.find_first_not_of(' ', length);
    line.remove_prefix(next == line.npos ? line.size() : next);
  }
  return cells;
}

// Each example by the names of its columns; a cell that is left out at the
// end of a line is not compared.
std::vector<Example> examples() {
  std::vector<Example> found;
  Cells names;
  for (const std::string& line : kit::lines_of(k_page)) {
    if (!line.starts_with("    ")) {
      names.clear();
      continue;
    }
    const Cells cells = columns_of(std::string_view(line).substr(4));
    if (cells.size() > 1 && cells[0] == "pattern") {
      names = cells;
    } else if (!names.empty()) {
      EXPECT_LE(cells.size(), names.size()) << line;
      Example& example = found.emplace_back();
      for (std::size_t i = 0; i < cells.size() && i < names.size(); ++i)
        example[names[i]] = cells[i];
    }
  }
  return found;
}

char byte_of(char letter) {
  switch (letter) {
    case 'n':
      return '\n';
    case 'r':
      return '\r';
    case 't':
      return '\t';
    case '0':
      return '\0';
    default:
      return letter;
  }
}

// The texts in quotes of a cell.
Cells texts_of(const std::string& cell) {
  Cells texts;
  bool inside = false;
  for (std::size_t i = 0; i < cell.size(); ++i) {
    if (cell[i] == '"') {
      inside = !inside;
      if (inside) texts.emplace_back();
    } else if (!inside) {
      EXPECT_EQ(cell[i], ' ') << cell;
    } else if (cell[i] == '\\' && cell[i + 1] == 'x') {
      texts.back() +=
          static_cast<char>(std::stoi(cell.substr(i + 2, 2), nullptr, 16));
      i += 3;
    } else if (cell[i] == '\\') {
      texts.back() += byte_of(cell[++i]);
    } else {
      texts.back() += cell[i];
    }
  }
  EXPECT_FALSE(inside) << cell;
  return texts;
}

std::string text_of(const std::string& cell) {
  const Cells texts = texts_of(cell);
  EXPECT_EQ(texts.size(), 1U) << cell;
  return texts.empty() ? "" : texts[0];
}

using kit::str;
using kit::text_of;

std::int32_t number_in(const std::string& column) {
  return std::stoi(column.substr(column.find(' ')));
}

void expect_found(bool is_found, const std::string& cell) {
  EXPECT_EQ(is_found, cell != "none");
  if (!is_found || cell == "none") return;
  EXPECT_EQ(text_of(group_text(0)), text_of(cell));
}

// Compares one column; false if there is none of that name.
bool compare(const Example& example, const std::string& column,
             const std::string& cell) {
  const zxStr pattern = str(example.at("pattern"));
  const zxStr text =
      example.contains("text") ? str(text_of(example.at("text"))) : zxStr();
  if (column == "refused because") {
    EXPECT_FALSE(check_pattern(pattern));
  } else if (column == "found") {
    expect_found(match(text, pattern), cell);
  } else if (column == "without case") {
    expect_found(imatch(text, pattern), cell);
  } else if (column.starts_with("group ")) {
    EXPECT_TRUE(example.contains("without case") ? imatch(text, pattern)
                                                 : match(text, pattern));
    EXPECT_EQ(text_of(group_text(number_in(column))), text_of(cell));
  } else if (column.starts_with("field ")) {
    EXPECT_TRUE(match(text, pattern));
    EXPECT_EQ(text_of(field_text(number_in(column))), text_of(cell));
  } else if (column.starts_with("type ")) {
    EXPECT_TRUE(match(text, pattern));
    EXPECT_EQ(std::string(1, field_type(number_in(column))), cell);
  } else if (column.starts_with("alternative ")) {
    EXPECT_TRUE(match(text, pattern));
    EXPECT_EQ(alternative(number_in(column)), std::stoi(cell));
  } else if (column == "result") {
    zxStr changed = text;
    EXPECT_TRUE(replace_all(changed, pattern, str(example.at("replacement"))));
    EXPECT_EQ(text_of(changed), text_of(cell));
  } else if (column == "pieces") {
    zxStr rest = text;
    zxStr piece;
    Cells pieces;
    while (cut_first(rest, piece, pattern)) pieces.push_back(text_of(piece));
    EXPECT_EQ(pieces, texts_of(cell));
  } else {
    return column == "pattern" || column == "text" || column == "replacement";
  }
  return true;
}

TEST(zxstrm_page, each_example_is_as_it_says) {
  int comparisons = 0;
  for (const Example& example : examples()) {
    SCOPED_TRACE(example.at("pattern") +
                 (example.contains("text") ? " on " + example.at("text") : ""));
    EXPECT_GE(example.size(), 2U);
    for (const auto& [column, cell] : example) {
      EXPECT_TRUE(compare(example, column, cell)) << column;
      ++comparisons;
    }
  }
  EXPECT_GT(comparisons, 400);
}

// True if a pattern takes the byte for itself.
bool is_plain(char byte) {
  const std::string text = std::string("a") + byte + "a";
  return check_pattern(str(text)) && match(str(text), str(text)) &&
         group_length(0) == 3 && (byte == '-' || !match("a-a", str(text)));
}

TEST(zxstrm_page, the_bytes_to_escape_are_those_with_a_meaning) {
  std::string bytes;
  for (const std::string& line : kit::lines_of(k_page))
    if (line.starts_with("    ^ $ "))
      for (const std::string& byte : columns_of(line)) bytes += byte;
  std::erase(bytes, ' ');
  EXPECT_EQ(bytes.size(), 15U);
  for (int i = 1; i < 256; ++i) {
    const char byte = static_cast<char>(i);
    if (byte == '{') continue;  // with a meaning at some places only
    EXPECT_EQ(is_plain(byte), bytes.find(byte) == bytes.npos) << i;
  }
}

}  // namespace
