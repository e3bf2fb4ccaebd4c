// zxnextf_page_test.cpp - the examples of docs/file-names.md.
// Tests zxlib/zxnextf.h and zxisfile.h.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include "kit/pages.h"
#include "kit/tempdir.h"
#include "zxisfile.h"
#include "zxnextf.h"

namespace {

namespace fs = std::filesystem;

using Names = std::vector<std::string>;

constexpr char k_page[] = "docs/file-names.md";

// Makes the files that stand indented on the page.
void make_files(const kit::TempDir& folder) {
  std::istringstream in(kit::indented_in(k_page));
  for (std::string name; std::getline(in, name);) {
    std::replace(name.begin(), name.end(), '\\', '/');
    const fs::path path = fs::path(folder.path()) / name;
    fs::create_directories(path.parent_path());
    kit::write_file(path.string(), "x");
  }
}

Names words_of(const std::string& text) {
  std::istringstream in(text);
  Names words;
  for (std::string word; in >> word;) words.push_back(word);
  return words;
}

Names names_of(const std::string& specification) {
  zxQVA<zxStr> list;
  list.append(specification.c_str());
  Names names;
  for (zxStr name; next_file(list, name);) names.emplace_back(name.view());
  std::sort(names.begin(), names.end());
  return names;
}

TEST(zxnextf_page, each_specification_stands_for_the_names_beside_it) {
  const kit::TempDir folder;
  make_files(folder);
  const kit::WorkingIn there(folder.path());
  int rows = 0;
  for (const auto& cells : kit::rows_in(k_page)) {
    if (cells.size() != 2) continue;  // what differs between systems
    if (cells[0].find_first_of("\\/") == std::string::npos) continue;
    EXPECT_EQ(names_of(cells[0]), words_of(cells[1])) << cells[0];
    ++rows;
  }
  EXPECT_EQ(rows, 10);
}

// Each letter of the table is one: what is none fails an assertion, at the
// cost of the process.
TEST(zxnextf_page, each_letter_of_the_page_asks_something) {
  const kit::TempDir folder;
  std::string letters;
  for (const auto& cells : kit::rows_in(k_page)) {
    if (cells.size() != 2) continue;
    const Names words = words_of(cells[0]);
    for (const std::string& word : words)
      if (word.size() <= 2) letters += word[0];
  }
  EXPECT_EQ(letters, "dfcrwxszBT");
  for (const char letter : letters) {
    const char test[] = {letter, '\0'};
    isfile(folder.path().c_str(), test);
  }
}

}  // namespace
