// Tests of the writer of tables: obautil/mkvtx/vtxwrite.h, .cpp, and of the
// way from a text through the files to the reader.
#include "vtxwrite.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <iterator>
#include <string>
#include <vector>

#include "kit/failure.h"
#include "kit/faults.h"
#include "kit/tempdir.h"
#include "vtxtext.h"

namespace {

namespace fs = std::filesystem;

zxStr name_of(const std::string& text) { return text.c_str(); }

void parse(std::string_view text, VtxTable& table) {
  VtxTextError error;
  ASSERT_TRUE(parse_vtx_text(text, table, error))
      << error.line << ": " << error.what.c_str();
}

using Names = std::vector<std::string>;
const Names k_d4w_pair = {"D4WVTX.BIN", "D4WVTX.IDX"};
const Names k_r9q_pair = {"R9QVTX.BIN", "R9QVTX.IDX"};

// ---- the bytes, laid out by hand

std::string little_endian(unsigned long value, int size) {
  std::string bytes;
  for (int i = 0; i < size; ++i)
    bytes += static_cast<char>(value >> 8 * i & 0xFF);
  return bytes;
}

std::string padded(std::string text, std::size_t size) {
  text.resize(size, '\0');
  return text;
}

void put(std::string& bytes, std::size_t at, const std::string& what) {
  bytes.replace(at, what.size(), what);
}

constexpr char k_text[] =
    "table-date 1970-01-06\n"
    "version 123\n"
    "stamp 305419896\n"
    "security 5 ABC\n"
    "type I\n"
    "text 0 zero\n"
    "text 8 eight\n"
    "num 52 12.51\n"
    "date 11 1970-02-01\n"
    "no-record 6 \u05D0\u05D1\n"
    "security -7\n"
    "text 1 \u05D2 1\n";

std::string expected_index() {
  return little_endian(4321501, 4) + little_endian(3, 2) + padded("ABC", 16) +
         little_endian(5, 4) + little_endian(55, 4) + padded("\x81\x80", 16) +
         little_endian(6, 4) + "\xFF\xFF\xFF\xFF" + padded("", 16) +
         "\xF9\xFF\xFF\xFF" + little_endian(55 + 1259, 4);
}

std::string expected_data() {
  std::string data(55 + 2 * 1259, '\0');
  put(data, 0, "R9QVTX123");
  put(data, 11, little_endian(0x12345678, 4));
  const std::size_t first = 55;
  put(data, first, little_endian(5, 2));
  put(data, first + 2, little_endian(1, 2));
  put(data, first + 4, "zero");
  put(data, first + 4 + 8 * 65, "eight");
  put(data, first + 589, little_endian(10, 4));
  put(data, first + 589 + 52 * 4, little_endian(5007, 4));
  put(data, first + 801 + 11 * 2, little_endian(31, 2));
  const std::size_t second = first + 1259;
  put(data, second, little_endian(5, 2));
  put(data, second + 4 + 65, "1 \x82");
  put(data, second + 589, "\xF2\xFF\xFF\xFF");
  return data;
}

TEST(vtxwrite, the_pair_holds_the_table_byte_for_byte) {
  const kit::TempDir folder;
  VtxTable table;
  parse(k_text, table);
  write_vtx_table(table, name_of(folder.path()), k_d4w_names);
  EXPECT_EQ(kit::names_in(folder.path()), k_d4w_pair);
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.IDX")), expected_index());
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.BIN")), expected_data());
}

TEST(vtxwrite, the_other_names_get_the_same_bytes) {
  const kit::TempDir folder;
  VtxTable table;
  parse(k_text, table);
  write_vtx_table(table, name_of(folder.path() + "/"), k_r9q_names);
  EXPECT_EQ(kit::names_in(folder.path()), k_r9q_pair);
  EXPECT_EQ(kit::read_file(folder.file("R9QVTX.IDX")), expected_index());
  EXPECT_EQ(kit::read_file(folder.file("R9QVTX.BIN")), expected_data());
}

TEST(vtxwrite, the_index_is_that_of_the_lookup_database) {
  const kit::TempDir folder;
  VtxTable table;
  parse(k_text, table);
  vtx_write_index(name_of(folder.path() + "\\"), &table.entries.get(0),
                  table.entries.length());
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.IDX")), expected_index());
}

TEST(vtxwrite, an_old_pair_is_replaced) {
  const kit::TempDir folder;
  kit::write_file(folder.file("D4WVTX.IDX"), std::string(5000, 'x'));
  kit::write_file(folder.file("D4WVTX.BIN"), std::string(50000, 'x'));
  VtxTable table;
  parse(k_text, table);
  write_vtx_table(table, name_of(folder.path()), k_d4w_names);
  EXPECT_EQ(kit::names_in(folder.path()), k_d4w_pair);
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.IDX")), expected_index());
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.BIN")), expected_data());
}

// ---- from a text to the reader

// A directory's table, open while one lives.
class OpenTable {
 public:
  explicit OpenTable(const kit::TempDir& folder)
      : code(init_vtx(name_of(folder.path() + "\\"))) {}
  OpenTable(const OpenTable&) = delete;
  OpenTable& operator=(const OpenTable&) = delete;
  ~OpenTable() { vtx_close(); }
  int code;
};

TEST(vtxwrite, the_reader_finds_what_the_text_says) {
  for (const VtxFileNames& names : {k_d4w_names, k_r9q_names}) {
    SCOPED_TRACE(names.index);
    const kit::TempDir folder;
    VtxTable made;
    parse(k_text, made);
    write_vtx_table(made, name_of(folder.path()), names);
    const OpenTable table(folder);
    ASSERT_EQ(table.code, k_vtx_ok);
    EXPECT_EQ(vtx_count(), 3);
    EXPECT_EQ(vtx_stamp(), 305419896U);
    EXPECT_EQ(vtx_version(), 123);
    EXPECT_EQ(vtx_date().days(), 5);
    EXPECT_TRUE(vtx_name_by_code(5) == "ABC");
    EXPECT_TRUE(vtx_name_by_index(1) == "\x81\x80");
    EXPECT_EQ(vtx_code_by_index(2), -7);

    VtxRecord record;
    ASSERT_EQ(vtx_read_by_index(0, record), k_vtx_ok);
    EXPECT_EQ(record.type, 1);
    EXPECT_EQ(record.text_field(0), "zero");
    EXPECT_EQ(record.num[0].to_double(), 5);
    EXPECT_EQ(record.num[52].to_double(), 12.51);
    EXPECT_EQ(zxDate(record.dates[11]).days(), 31);
    EXPECT_EQ(vtx_read_by_index(1, record), k_vtx_no_record);
    ASSERT_EQ(vtx_read_by_code(-7, record), k_vtx_ok);
    EXPECT_EQ(record.text_field(1), "1 \x82");
  }
}

TEST(vtxwrite, a_rebuilt_index_is_the_one_that_was_written) {
  const kit::TempDir folder;
  VtxTable made;
  parse(k_text, made);
  write_vtx_table(made, name_of(folder.path()), k_d4w_names);
  const OpenTable table(folder);
  ASSERT_EQ(table.code, k_vtx_ok);
  vtx_rebuild_index();
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.IDX")), expected_index());
}

TEST(vtxwrite, a_table_of_full_size_is_written_and_read) {
  const kit::TempDir folder;
  std::string text;
  for (int i = 0; i < 32767; ++i) {
    text += "security " + std::to_string(i) + " N\ntext 1 x\n";
  }
  VtxTable made;
  parse(text, made);
  write_vtx_table(made, name_of(folder.path()), k_d4w_names);
  EXPECT_EQ(fs::file_size(folder.file("D4WVTX.BIN")), 55U + 32767U * 1259U);
  const OpenTable table(folder);
  ASSERT_EQ(table.code, k_vtx_ok);
  VtxRecord record;
  ASSERT_EQ(vtx_read_by_index(32766, record), k_vtx_ok);
  EXPECT_EQ(record.num[0].to_double(), 32766);
}

// ---- failures

TEST(vtxwrite, a_directory_that_is_not_there_is_fatal) {
  const kit::TempDir folder;
  VtxTable table;
  parse(k_text, table);
  const zxStr directory = name_of(folder.file("none"));
  const kit::Failure failure =
      kit::failure_of([&] { write_vtx_table(table, directory, k_d4w_names); });
  EXPECT_EQ(failure.exit_code, 100);
  clear_unfinished_vtx();
  EXPECT_EQ(kit::names_in(folder.path()), Names());
}

// A folder with an old pair, for writes that fail.
struct Failing {
  const std::string old_index = "the old index";
  const std::string old_data = "the old data";
  const kit::TempDir folder;
  VtxTable table;

  Failing() {
    parse(k_text, table);
    kit::write_file(folder.file("D4WVTX.IDX"), old_index);
    kit::write_file(folder.file("D4WVTX.BIN"), old_data);
  }

  void write() { write_vtx_table(table, name_of(folder.path()), k_d4w_names); }

  // A final name holds a whole file or is free, and no other name is left.
  void check_files(bool with_old) const {
    for (const std::string& name : kit::names_in(folder.path())) {
      const std::string bytes = kit::read_file(folder.file(name));
      if (name == "D4WVTX.IDX")
        EXPECT_TRUE(bytes == expected_index() ||
                    (with_old && bytes == old_index));
      else if (name == "D4WVTX.BIN")
        EXPECT_TRUE(bytes == expected_data() ||
                    (with_old && bytes == old_data));
      else
        ADD_FAILURE() << "left behind: " << name;
    }
  }
};

TEST(vtxwrite, each_call_that_fails_is_fatal_and_leaves_no_half_file) {
  const struct {
    kit::Call call;
    int calls;  // at least, in a run
    const char* number;
  } rows[] = {
      {kit::Call::open, 2, "1004: "},   {kit::Call::write, 2, "1016: "},
      {kit::Call::close, 2, "1010: "},  {kit::Call::rename, 2, "1036: "},
      {kit::Call::remove, 2, "1027: "},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(kit::name_of(row.call));
    int failed = 0;
    for (int n = 1;; ++n) {
      SCOPED_TRACE(n);
      Failing test;
      kit::Failure failure;
      {
        kit::Faults faults;
        faults.fail_nth(row.call, n);
        failure = kit::failure_of([&] { test.write(); });
      }
      clear_unfinished_vtx();
      test.check_files(failure.failed);
      if (!failure.failed) break;
      ++failed;
      EXPECT_EQ(failure.exit_code, 100);
      // Bytes that were still in the buffer are missed at the close.
      if (row.call != kit::Call::write) {
        EXPECT_EQ(failure.message.substr(0, 6), row.number);
      }
      ASSERT_LT(n, 100);
    }
    EXPECT_GE(failed, row.calls);
  }
}

TEST(vtxwrite, a_failure_ahead_of_the_moves_leaves_the_old_pair) {
  for (const kit::Call call :
       {kit::Call::open, kit::Call::write, kit::Call::close}) {
    SCOPED_TRACE(kit::name_of(call));
    Failing test;
    {
      kit::Faults faults;
      faults.fail_nth(call, 2);
      EXPECT_TRUE(kit::failure_of([&] { test.write(); }).failed);
    }
    clear_unfinished_vtx();
    EXPECT_EQ(kit::names_in(test.folder.path()), k_d4w_pair);
    EXPECT_EQ(kit::read_file(test.folder.file("D4WVTX.IDX")), test.old_index);
    EXPECT_EQ(kit::read_file(test.folder.file("D4WVTX.BIN")), test.old_data);
  }
}

TEST(vtxwrite, a_dropped_failure_moves_nothing) {
  for (const kit::Call call :
       {kit::Call::open, kit::Call::write, kit::Call::close}) {
    SCOPED_TRACE(kit::name_of(call));
    Failing test;
    {
      kit::Faults faults;
      faults.fail_nth(call, 1);
      kit::with_failures_dropped([&] { test.write(); });
    }
    EXPECT_EQ(kit::names_in(test.folder.path()), k_d4w_pair);
    EXPECT_EQ(kit::read_file(test.folder.file("D4WVTX.IDX")), test.old_index);
    EXPECT_EQ(kit::read_file(test.folder.file("D4WVTX.BIN")), test.old_data);
  }
}

TEST(vtxwrite, clearing_with_nothing_unfinished_does_nothing) {
  const kit::TempDir folder;
  VtxTable table;
  parse(k_text, table);
  write_vtx_table(table, name_of(folder.path()), k_d4w_names);
  clear_unfinished_vtx();
  clear_unfinished_vtx();
  EXPECT_EQ(kit::names_in(folder.path()), k_d4w_pair);
}

}  // namespace
