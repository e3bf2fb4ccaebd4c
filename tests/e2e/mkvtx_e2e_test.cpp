// Runs mkvtx as a process: obautil/mkvtx/mkvtx.cpp with its modules, the
// sample table in samples/table, and the examples of docs/mkvtx.md and
// docs/table-format.md.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include "hvldec.h"
#include "kit/pages.h"
#include "kit/process.h"
#include "kit/tempdir.h"
#include "vtxtext.h"
#include "vtxvalue.h"

namespace {

namespace fs = std::filesystem;

using kit::indented_in;
using kit::lines_of;
using kit::rows_in;
using kit::source;

std::string variable(const char* name) {
  const char* const value = std::getenv(name);
  if (value == nullptr) ADD_FAILURE() << name << " is not set";
  return value == nullptr ? "" : value;
}

std::string program(const std::string& name) {
  return variable("ZX_BIN_DIR") + "/" + name;
}

kit::ProcessResult run(std::vector<std::string> command,
                       const kit::TempDir& folder,
                       const std::string& input = "") {
  command[0] = program(command[0]);
  kit::ProcessOptions options;
  options.directory = folder.path();
  options.input = input;
  return kit::run_process(command, options);
}

using Names = std::vector<std::string>;

constexpr char k_good[] = "security 1 X\ntext 1 x\n";

// ---- the sample

TEST(mkvtx_e2e, the_sample_is_made_again_byte_for_byte) {
  const kit::TempDir folder;
  const auto result =
      run({"mkvtx", source("samples/table/securities.txt")}, folder);
  EXPECT_EQ(result.exit_code, 0) << result.out;
  EXPECT_EQ(result.out, "23 entries, 21 records\r\n");
  EXPECT_EQ(result.err, "");
  EXPECT_EQ(kit::names_in(folder.path()), (Names{"D4WVTX.BIN", "D4WVTX.IDX"}));
  for (const std::string name : {"D4WVTX.IDX", "D4WVTX.BIN"}) {
    SCOPED_TRACE(name);
    EXPECT_TRUE(kit::read_file(folder.file(name)) ==
                kit::read_file(source("samples/table/" + name)));
  }
}

TEST(mkvtx_e2e, the_sample_made_again_exports_as_expected) {
  for (const bool r9q : {false, true}) {
    SCOPED_TRACE(r9q);
    const kit::TempDir folder;
    std::vector<std::string> command = {"mkvtx"};
    if (r9q) command.push_back("-r9q");
    command.push_back(source("samples/table/securities.txt"));
    EXPECT_EQ(run(command, folder).exit_code, 0);
    EXPECT_EQ(run({"vtx2csv", "out.csv"}, folder).exit_code, 0);
    EXPECT_EQ(kit::read_file(folder.file("out.csv")),
              kit::read_file(source("samples/table/expected.csv")));
  }
}

// ---- arguments

TEST(mkvtx_e2e, r9q_changes_the_names) {
  const kit::TempDir folder;
  kit::write_file(folder.file("t.txt"), k_good);
  fs::create_directory(folder.file("out"));
  const auto result = run({"mkvtx", "-r9q", "t.txt", "out"}, folder);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "1 entries, 1 records\r\n");
  EXPECT_EQ(kit::names_in(folder.file("out")),
            (Names{"R9QVTX.BIN", "R9QVTX.IDX"}));
  EXPECT_EQ(kit::names_in(folder.path()), (Names{"out", "t.txt"}));
}

TEST(mkvtx_e2e, the_directory_may_end_in_a_separator) {
  for (const std::string end : {"", "/", "\\"}) {
    SCOPED_TRACE(end);
    const kit::TempDir folder;
    kit::write_file(folder.file("t.txt"), k_good);
    fs::create_directory(folder.file("out"));
    EXPECT_EQ(run({"mkvtx", "t.txt", "out" + end}, folder).exit_code, 0);
    EXPECT_EQ(kit::names_in(folder.file("out")),
              (Names{"D4WVTX.BIN", "D4WVTX.IDX"}));
  }
}

TEST(mkvtx_e2e, the_text_may_come_from_the_standard_input) {
  const kit::TempDir folder;
  EXPECT_EQ(run({"mkvtx", "-"}, folder, k_good).exit_code, 0);
  EXPECT_EQ(kit::names_in(folder.path()), (Names{"D4WVTX.BIN", "D4WVTX.IDX"}));
}

TEST(mkvtx_e2e, bad_arguments_show_the_usage) {
  const struct {
    std::vector<std::string> arguments;
    std::string start;
  } rows[] = {
      {{"-?"}, "Usage: MKVTX 1.00 [-?] [-r9q] text-file [directory]\r\n"},
      {{}, "Error: no text file is named\r\nUsage: MKVTX 1.00 "},
      {{"-r9q"}, "Error: no text file is named\r\nUsage: MKVTX 1.00 "},
      {{"-x", "t.txt"}, "Error: bad option: -x\r\nUsage: MKVTX 1.00 "},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.start);
    const kit::TempDir folder;
    std::vector<std::string> command = {"mkvtx"};
    command.insert(command.end(), row.arguments.begin(), row.arguments.end());
    const auto result = run(command, folder);
    EXPECT_EQ(result.exit_code, 1);
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err.substr(0, row.start.size()), row.start);
    EXPECT_EQ(kit::names_in(folder.path()), Names());
  }
}

// ---- errors

TEST(mkvtx_e2e, an_error_in_the_text_writes_nothing) {
  const kit::TempDir folder;
  kit::write_file(folder.file("t.txt"),
                  "security 1 X\ntext 1 x\n\nnum 1 1..5\n");
  kit::write_file(folder.file("D4WVTX.BIN"), "old");
  const auto result = run({"mkvtx", "t.txt"}, folder);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_NE(result.out.find(" 1.00 Fatal Error t.txt(4): '1..5' is no number"),
            std::string::npos)
      << result.out;
  EXPECT_EQ(kit::names_in(folder.path()),
            (Names{"D4WVTX.BIN", "MKVTX.dmp", "t.txt"}));
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.BIN")), "old");
}

TEST(mkvtx_e2e, a_text_that_is_not_there_is_an_error) {
  const kit::TempDir folder;
  const auto result = run({"mkvtx", "none.txt"}, folder);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_NE(result.out.find(" Fatal Error 1002: "), std::string::npos)
      << result.out;
  EXPECT_EQ(kit::names_in(folder.path()), Names{"MKVTX.dmp"});
}

TEST(mkvtx_e2e, a_directory_that_is_not_there_is_an_error) {
  const kit::TempDir folder;
  kit::write_file(folder.file("t.txt"), k_good);
  const auto result = run({"mkvtx", "t.txt", "none"}, folder);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(kit::names_in(folder.path()), (Names{"MKVTX.dmp", "t.txt"}));
}

// The last move fails, when all is written and the data file has its name.
TEST(mkvtx_e2e, a_move_that_fails_leaves_no_temporary_file) {
  const kit::TempDir folder;
  kit::write_file(folder.file("t.txt"), k_good);
  fs::create_directory(folder.file("D4WVTX.IDX"));
  const auto result = run({"mkvtx", "t.txt"}, folder);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(kit::names_in(folder.path()),
            (Names{"D4WVTX.BIN", "D4WVTX.IDX", "MKVTX.dmp", "t.txt"}));
}

// ---- the examples of the pages

// The blocks that start with ```vtx.
std::vector<std::string> examples_in(const std::string& file) {
  std::vector<std::string> blocks;
  bool inside = false;
  for (const std::string& line : lines_of(file)) {
    if (line == "```vtx") blocks.emplace_back();
    if (inside && line != "```") blocks.back() += line + "\n";
    inside = line == "```vtx" || (inside && line != "```");
  }
  return blocks;
}

std::string text_of(HvlDecimal number) {
  char text[HvlDecimal::k_max_text];
  return std::string(text, number.write_text(text));
}

std::int32_t word_of(const std::string& cell) {
  return static_cast<std::int32_t>(std::stoll(cell, nullptr, 0));
}

TEST(mkvtx_e2e, the_examples_of_the_text_page_are_good) {
  const std::vector<std::string> blocks = examples_in("docs/mkvtx.md");
  EXPECT_GE(blocks.size(), 4U);
  for (const std::string& block : blocks) {
    SCOPED_TRACE(block);
    VtxTable table;
    VtxTextError error;
    EXPECT_TRUE(parse_vtx_text(block, table, error))
        << error.line << ": " << error.what.c_str();
  }
}

// Rows: notation, word, exported.
TEST(mkvtx_e2e, the_numbers_of_the_text_page_are_right) {
  int rows = 0;
  for (const auto& cells : rows_in("docs/mkvtx.md")) {
    if (cells.size() != 4 || !cells[2].starts_with("0x")) continue;
    SCOPED_TRACE(cells[0]);
    HvlDecimal number;
    zxStr wrong;
    EXPECT_TRUE(number_value(cells[0], number, wrong)) << wrong.c_str();
    EXPECT_EQ(number.word(), word_of(cells[2]));
    EXPECT_EQ(text_of(number), cells[3]);
    ++rows;
  }
  EXPECT_GE(rows, 10);
}

// Rows: word, bytes in the file, form, value.
TEST(mkvtx_e2e, the_words_of_the_format_page_are_right) {
  int rows = 0;
  for (const auto& cells : rows_in("docs/table-format.md")) {
    if (cells.size() != 4 || !cells[0].starts_with("0x")) continue;
    SCOPED_TRACE(cells[0]);
    const HvlDecimal number = HvlDecimal::from_word(word_of(cells[0]));
    EXPECT_EQ(text_of(number), cells[3]);
    std::string bytes;
    for (const unsigned char byte : std::string_view(
             reinterpret_cast<const char*>(&number), sizeof number)) {
      constexpr char k_digits[] = "0123456789ABCDEF";
      if (!bytes.empty()) bytes += ' ';
      bytes += k_digits[byte >> 4];
      bytes += k_digits[byte & 15];
    }
    EXPECT_EQ(bytes, cells[1]);
    ++rows;
  }
  EXPECT_GE(rows, 8);
}

TEST(mkvtx_e2e, the_examples_of_the_failure_page_are_right) {
  const std::string page = indented_in("docs/failures.md");
  const kit::TempDir folder;
  const std::string out = run({"mkvtx", "none.txt"}, folder).out;
  const std::size_t behind_path = out.find(" 1.00 Fatal Error");
  ASSERT_NE(behind_path, std::string::npos) << out;
  std::string screen = out.substr(behind_path);
  std::erase(screen, '\r');
  EXPECT_NE(page.find("mkvtx" + screen), std::string::npos) << screen;

  std::istringstream dump(kit::read_file(folder.file("MKVTX.dmp")));
  for (std::string line; std::getline(dump, line);) {
    std::erase(line, '\r');
    if (line.starts_with("------ ret @ADDR")) break;
    if (line.starts_with("@PROG:")) line = "@PROG:mkvtx";
    EXPECT_NE(page.find(line + "\n"), std::string::npos) << line;
  }
}

}  // namespace
