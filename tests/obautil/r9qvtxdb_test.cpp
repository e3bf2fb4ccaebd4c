// r9qvtxdb_test.cpp - tests of obautil/vtx2csv/r9qvtxdb.h (r9qvtxdb.cpp): the
// lookup database, on files that are made byte by byte.
#include "r9qvtxdb.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "kit/failure.h"
#include "kit/faults.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "obautil/table_bytes.h"

namespace {

namespace fs = std::filesystem;

using kit::Call;
using kit::Faults;
using namespace std::string_literals;
using namespace table_bytes;

constexpr char k_d4w_idx[] = "D4WVTX.IDX";
constexpr char k_d4w_bin[] = "D4WVTX.BIN";
constexpr char k_r9q_idx[] = "R9QVTX.IDX";
constexpr char k_r9q_bin[] = "R9QVTX.BIN";

using kit::str;
std::string std_str(const zxStr& text) { return std::string(text.view()); }

std::string bytes_of(const VtxRecord& record) {
  return {reinterpret_cast<const char*>(&record), sizeof record};
}

VtxRecord record_of(const Record& record) {
  VtxRecord result;
  std::memcpy(static_cast<void*>(&result), record.bytes.data(), sizeof result);
  return result;
}

// A folder for the files of a table, and the module closed around each test.
class r9qvtxdb : public testing::Test {
 protected:
  ~r9qvtxdb() override { vtx_close(); }

  void write(const std::string& name, const std::string& bytes) const {
    kit::write_file(folder.file(name), bytes);
  }
  std::string read(const std::string& name) const {
    return kit::read_file(folder.file(name));
  }
  bool exists(const std::string& name) const {
    return fs::exists(folder.file(name));
  }

  // The name that the module makes of a file.
  std::string full(const std::string& name) const {
    return folder.path() + "\\" + name;
  }

  int open() const { return init_vtx(str(folder.path())); }

  // Opens an index of its own making together with the data of three
  // securities.
  int open_index(const std::string& index) {
    write(k_d4w_idx, index);
    write(k_d4w_bin, k_three);
    return open();
  }
  int open_entries(const std::vector<Entry>& entries) {
    return open_index(index_bytes(entries));
  }

  // Opens data of its own making with an index of one entry.
  int open_data(const std::string& data) {
    write(k_d4w_idx, index_bytes({{"A", 1, 55}}));
    write(k_d4w_bin, data);
    return open();
  }

  // A failed call on one of the files: message and line.
  void expect_file_failure(const kit::Failure& failure, int number,
                           const std::string& words,
                           const std::string& name) const {
    const std::string n = std::to_string(number);
    EXPECT_TRUE(failure.failed);
    EXPECT_EQ(failure.message, n + ": " + words);
    EXPECT_EQ(failure.line,
              "[" + n + "-" + n + "-0/E-0/E/" + name.substr(0, 12) + "/]");
  }

  const std::string k_three = data_bytes(
      {security(1, "one"), security(2, "two"), security(3, "three")});
  const std::vector<Entry> k_three_entries = {{"ONE", 1, offset_of(0)},
                                              {"TWO", 2, offset_of(1)},
                                              {"THREE", 3, offset_of(2)}};
  kit::TempDir folder;
};

// ---- opening: the names

TEST_F(r9qvtxdb, a_good_table_opens) {
  EXPECT_EQ(open_entries(k_three_entries), 0);
  EXPECT_EQ(vtx_count(), 3);
}

TEST_F(r9qvtxdb, without_an_index_opening_gives_1) {
  EXPECT_EQ(open(), 1);
  write(k_d4w_bin, k_three);
  write(k_r9q_bin, k_three);
  EXPECT_EQ(open(), 1);
  EXPECT_EQ(init_vtx(str(full("none"))), 1);
  EXPECT_EQ(init_vtx(str(std::string(300, 'x'))), 1);
  EXPECT_EQ(vtx_has_index(0), 7);
}

TEST_F(r9qvtxdb, a_folder_is_no_index) {
  fs::create_directory(folder.file(k_d4w_idx));
  EXPECT_EQ(open(), 1);
  write(k_r9q_idx, index_bytes({{"A", 1, 55}}));
  write(k_r9q_bin, k_three);
  EXPECT_EQ(open(), 0);
}

// The names of the two files that are there, and what comes of them.
struct Pair {
  std::vector<std::string> names;
  int code;
};

TEST_F(r9qvtxdb, each_file_is_looked_for_under_both_names) {
  const Pair k_rows[] = {
      {{k_d4w_idx, k_d4w_bin}, 0},
      {{k_r9q_idx, k_r9q_bin}, 0},
      {{k_d4w_idx, k_r9q_bin}, 0},
      {{k_r9q_idx, k_d4w_bin}, 0},
      {{k_d4w_idx}, 5},
      {{k_r9q_idx}, 5},
      {{k_d4w_bin}, 1},
      {{k_r9q_bin}, 1},
  };
  for (const Pair& row : k_rows) {
    SCOPED_TRACE(row.names[0]);
    for (const std::string& name : row.names)
      write(name,
            name.ends_with("IDX") ? index_bytes({{"A", 1, 55}}) : k_three);
    EXPECT_EQ(open(), row.code);
    vtx_close();
    for (const std::string& name : row.names) fs::remove(folder.file(name));
  }
}

TEST_F(r9qvtxdb, the_d4w_files_come_first) {
  write(k_d4w_idx, index_bytes({{"D4W", 1, 55}}));
  write(k_r9q_idx, index_bytes({{"R9Q", 1, 55}, {"R9Q", 2, 55}}));
  write(k_d4w_bin, data_bytes({security(1)}, data_head("R9QVTX104")));
  write(k_r9q_bin, data_bytes({security(1)}, data_head("R9QVTX109")));
  EXPECT_EQ(open(), 0);
  EXPECT_EQ(vtx_count(), 1);
  EXPECT_EQ(std_str(vtx_name_by_index(0)), "D4W");
  EXPECT_EQ(vtx_version(), 104);
}

TEST_F(r9qvtxdb, a_bad_d4w_file_is_not_rescued_by_a_good_r9q_file) {
  write(k_r9q_idx, index_bytes({{"A", 1, 55}}));
  write(k_r9q_bin, k_three);
  write(k_d4w_idx, "");
  EXPECT_EQ(open(), 2);
  fs::remove(folder.file(k_d4w_idx));
  write(k_d4w_bin, "");
  EXPECT_EQ(open(), 5);
}

TEST_F(r9qvtxdb, the_directory_is_taken_with_or_without_its_backslash) {
  write(k_d4w_idx, index_bytes({{"A", 1, 55}}));
  write(k_d4w_bin, k_three);
  for (const char* end : {"", "\\", "/"}) {
    SCOPED_TRACE(end);
    EXPECT_EQ(init_vtx(str(folder.path() + end)), 0);
    vtx_close();
  }
}

TEST_F(r9qvtxdb, the_empty_directory_is_the_working_directory) {
  write(k_d4w_idx, index_bytes({{"A", 1, 55}}));
  write(k_d4w_bin, k_three);
  const fs::path before = fs::current_path();
  fs::current_path(folder.path());
  const int code = init_vtx("");
  fs::current_path(before);
  EXPECT_EQ(code, 0);
}

// ---- opening: the index

TEST_F(r9qvtxdb, an_index_without_a_whole_head_gives_2) {
  const std::string whole = index_bytes(k_three_entries);
  for (const std::size_t size : {0U, 1U, 2U, 3U, 4U, 5U}) {
    SCOPED_TRACE(size);
    EXPECT_EQ(open_index(whole.substr(0, size)), 2);
  }
}

// What an earlier table left behind must not pass for a head.
TEST_F(r9qvtxdb, a_short_index_gives_2_behind_a_good_one_too) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  vtx_close();
  for (const std::size_t size : {0U, 1U, 4U, 5U}) {
    SCOPED_TRACE(size);
    EXPECT_EQ(open_index(index_head(1).substr(0, size)), 2);
  }
}

TEST_F(r9qvtxdb, an_index_with_another_magic_gives_2) {
  for (std::size_t i = 0; i < 4; ++i) {
    SCOPED_TRACE(i);
    std::string index = index_bytes(k_three_entries);
    index[i] = static_cast<char>(index[i] ^ 1);
    EXPECT_EQ(open_index(index), 2);
  }
  // It is tested ahead of the count.
  EXPECT_EQ(open_index(index_head(0, k_magic + 1)), 2);
}

TEST_F(r9qvtxdb, an_index_of_no_entries_is_an_assertion) {
  for (const int count : {0, -1, -32768}) {
    SCOPED_TRACE(count);
    write(k_d4w_idx, index_head(count) + entry_bytes({"A", 1, 55}));
    write(k_d4w_bin, k_three);
    EXPECT_ASSERTION(open(), "r9qvtxdb");
    kit::with_failures_dropped([&] { EXPECT_EQ(open(), 2); });
    EXPECT_EQ(vtx_has_index(0), 7);
  }
}

struct Size {
  int count;    // in the head
  int entries;  // in the file
  int stray;    // bytes behind them
  int code;
};

TEST_F(r9qvtxdb, an_index_holds_exactly_what_its_head_says) {
  constexpr Size k_rows[] = {
      {1, 0, 0, 2},   {1, 0, 23, 2},    {1, 1, 0, 0},  {1, 1, 1, 0},
      {1, 1, 23, 0},  {1, 2, 0, 2},     {1, 2, 5, 2},  {3, 2, 0, 2},
      {3, 2, 23, 2},  {3, 3, 0, 0},     {3, 3, 23, 0}, {3, 4, 0, 2},
      {3, 100, 0, 2}, {32767, 3, 0, 2},
  };
  for (const Size& row : k_rows) {
    SCOPED_TRACE(std::to_string(row.entries) + " of " +
                 std::to_string(row.count) + " and " +
                 std::to_string(row.stray));
    std::string index = index_head(row.count);
    for (int i = 0; i < row.entries; ++i) index += entry_bytes({"A", i, 55});
    EXPECT_EQ(open_index(index + std::string(zx_size(row.stray), 'A')),
              row.code);
    vtx_close();
  }
}

TEST_F(r9qvtxdb, the_largest_index_opens) {
  std::string index = index_head(32767);
  for (int i = 0; i < 32767; ++i) index += entry_bytes({"A", i + 1, 55});
  EXPECT_EQ(open_index(index), 0);
  EXPECT_EQ(vtx_count(), 32767);
  EXPECT_EQ(vtx_code_by_index(32766), 32767);
}

TEST_F(r9qvtxdb, entries_left_behind_by_a_failed_opening_are_an_assertion) {
  const std::string two_of_three =
      index_head(3) + entry_bytes({"A", 1, 55}) + entry_bytes({"B", 2, 55});
  EXPECT_EQ(open_index(two_of_three), 2);
  EXPECT_EQ(vtx_has_index(0), 7);
  EXPECT_ASSERTION(open(), "r9qvtxdb");
  kit::with_failures_dropped([&] { EXPECT_EQ(open(), 2); });
  vtx_close();
  EXPECT_EQ(open_entries(k_three_entries), 0);
}

TEST_F(r9qvtxdb, an_opening_that_read_no_entry_can_be_repeated) {
  EXPECT_EQ(open_index(index_head(3)), 2);
  EXPECT_EQ(open_index(index_head(5)), 2);
  EXPECT_EQ(open_entries(k_three_entries), 0);
}

TEST_F(r9qvtxdb, the_index_file_is_closed_again) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  std::error_code error;
  EXPECT_TRUE(fs::remove(folder.file(k_d4w_idx), error)) << error.message();
}

// ---- opening: the data

TEST_F(r9qvtxdb, a_data_file_without_head_and_record_gives_5) {
  const std::string whole = data_bytes({security(1)});
  for (const std::size_t size : {0U, 1U, 5U, 54U, 55U, 56U, 1313U}) {
    SCOPED_TRACE(size);
    EXPECT_EQ(open_data(whole.substr(0, size)), 5);
    vtx_close();
  }
  EXPECT_EQ(open_data(whole), 0);
}

TEST_F(r9qvtxdb, a_data_file_that_is_a_folder_is_passed_over) {
  write(k_d4w_idx, index_bytes({{"A", 1, 55}}));
  fs::create_directory(folder.file(k_d4w_bin));
  EXPECT_EQ(open(), 5);
  vtx_close();
  write(k_r9q_bin, k_three);
  EXPECT_EQ(open(), 0);
}

TEST_F(r9qvtxdb, a_data_file_that_is_read_only_is_passed_over) {
  write(k_d4w_idx, index_bytes({{"A", 1, 55}}));
  write(k_d4w_bin, k_three);
  fs::permissions(folder.file(k_d4w_bin), fs::perms::owner_read);
  EXPECT_EQ(open(), 5);
  vtx_close();
  write(k_r9q_bin, k_three);
  EXPECT_EQ(open(), 0);
}

struct HeadRow {
  std::string text;
  int code;
  int version;  // if the code is 0
};

TEST_F(r9qvtxdb, the_data_head_names_a_known_version) {
  const HeadRow k_rows[] = {
      {"R9QVTX101", 0, 101},
      {"R9QVTX102", 0, 102},
      {"R9QVTX999", 0, 999},
      {"R9QVTX1015", 0, 1015},
      {"R9QVTX0101", 0, 101},
      {"R9QVTX2147483647", 0, INT32_MAX},
      {"R9QVTX", 6, 0},
      {"R9QVTX100", 6, 0},
      {"R9QVTX099", 6, 0},
      {"R9QVTX0", 6, 0},
      {"R9QVTX2147483648", 6, 0},
      {"", 6, 0},
      {"101", 6, 0},
      {"R9QVT", 6, 0},
      {"R9QVTY101", 6, 0},
      {"r9qvtx101", 6, 0},
      {"D4WVTX101", 6, 0},
      {"R9QVTX-101", 6, 0},
      {"R9QVTX 101", 6, 0},
      {"R9QVTX1,015", 6, 0},
      {"R9QVTX101 ", 6, 0},
      {"R9QVTX101k", 6, 0},
      {"R9QVTX101\x1A", 6, 0},
      {"R9QVT101", 6, 0},
      // Without a NUL the text ends with the head, whatever follows there.
      {"R9QVTX" + std::string(46, '0') + "105", 0, 105},
      {"R9QVTX" + std::string(49, '1'), 6, 0},
  };
  for (const HeadRow& row : k_rows) {
    SCOPED_TRACE(row.text);
    Record first = security(1);
    first.at(0, "55555");
    EXPECT_EQ(open_data(data_bytes({first}, data_head(row.text))), row.code);
    if (row.code == 0) {
      EXPECT_EQ(vtx_version(), row.version);
    }
    vtx_close();
  }
}

TEST_F(r9qvtxdb, the_head_is_tested_ahead_of_the_first_record) {
  EXPECT_EQ(open_data(data_head("R9QVTX100")), 6);
  vtx_close();
  EXPECT_EQ(open_data(data_head("R9QVTX101")), 5);
}

TEST_F(r9qvtxdb, stamp_and_date_come_from_the_data) {
  write(k_d4w_idx, index_bytes({{"A", 1, offset_of(1)}}));
  write(k_d4w_bin, data_bytes({security(1).date(12345), security(2).date(99)},
                              data_head("R9QVTX101", 0xFEDCBA98)));
  ASSERT_EQ(open(), 0);
  EXPECT_EQ(vtx_stamp(), 0xFEDCBA98U);
  EXPECT_EQ(vtx_version(), 101);
  EXPECT_EQ(vtx_date().days(), 12345);
}

TEST_F(r9qvtxdb, any_date_is_taken) {
  ASSERT_EQ(open_data(data_bytes({security(1).date(-32768)})), 0);
  EXPECT_EQ(vtx_date().days(), -32768);
}

// ---- half open

TEST_F(r9qvtxdb, a_table_without_its_data_is_half_open) {
  write(k_d4w_idx, index_bytes({{"ONE", 1, 55}, {"TWO", 2, -1}}));
  EXPECT_EQ(open(), 5);
  EXPECT_EQ(open(), 8);
  EXPECT_EQ(vtx_count(), 2);
  EXPECT_EQ(vtx_has_code(1), 0);
  EXPECT_EQ(std_str(vtx_name_by_code(2)), "TWO");
  EXPECT_EQ(vtx_date().days(), 0);
  VtxRecord record;
  EXPECT_EQ(vtx_read_by_index(1, record), 3);
  EXPECT_ASSERTION(vtx_read_by_index(0, record), "zxbfile");
  EXPECT_FAILURE(vtx_put_record(record_of(security(2))),
                 "1012: seek: operation failed", "[1012-1012-0/E-0/E//]");
  EXPECT_ASSERTION(vtx_rebuild_index(), "zxbfile");
}

TEST_F(r9qvtxdb, a_table_with_bad_data_is_half_open) {
  for (const std::string& data :
       {std::string(20, 'x'), data_head("R9QVTX100"), data_head()}) {
    SCOPED_TRACE(data.size());
    EXPECT_NE(open_data(data), 0);
    EXPECT_EQ(open(), 8);
    EXPECT_EQ(vtx_count(), 1);
    VtxRecord record;
    EXPECT_EQ(vtx_read_by_index(0, record), 5);
    vtx_close();
  }
}

TEST_F(r9qvtxdb, a_half_open_table_is_closed_by_closing) {
  write(k_d4w_idx, index_bytes({{"A", 1, 55}}));
  EXPECT_EQ(open(), 5);
  vtx_close();
  EXPECT_EQ(vtx_has_index(0), 7);
  EXPECT_EQ(open_entries(k_three_entries), 0);
}

// ---- closed

TEST_F(r9qvtxdb, a_closed_table_answers_7) {
  VtxRecord record = record_of(security(5));
  EXPECT_EQ(vtx_read_by_code(1, record), 7);
  EXPECT_EQ(vtx_read_by_index(0, record), 7);
  EXPECT_EQ(vtx_has_code(1), 7);
  EXPECT_EQ(vtx_has_index(0), 7);
  EXPECT_EQ(bytes_of(record), security(5).bytes);
}

#define EXPECT_NOT_OPEN(statement) \
  EXPECT_FAILURE(statement, "500: ", "[500-500-0/E-0/E//]")

TEST_F(r9qvtxdb, every_other_operation_on_a_closed_table_is_fatal) {
  const VtxRecord record = record_of(security(1));
  EXPECT_NOT_OPEN(vtx_stamp());
  EXPECT_NOT_OPEN(vtx_version());
  EXPECT_NOT_OPEN(vtx_date());
  EXPECT_NOT_OPEN(vtx_count());
  EXPECT_NOT_OPEN(vtx_name_by_code(1));
  EXPECT_NOT_OPEN(vtx_name_by_index(0));
  EXPECT_NOT_OPEN(vtx_index_of_code(1));
  EXPECT_NOT_OPEN(vtx_code_by_index(0));
  EXPECT_NOT_OPEN(vtx_put_record(record));
  EXPECT_NOT_OPEN(vtx_rebuild_index());
}

TEST_F(r9qvtxdb, a_closed_table_is_neutral_when_failures_are_dropped) {
  kit::with_failures_dropped([] {
    EXPECT_EQ(vtx_stamp(), 0U);
    EXPECT_EQ(vtx_version(), 0);
    EXPECT_EQ(vtx_date().days(), 0);
    EXPECT_EQ(vtx_count(), 0);
    EXPECT_TRUE(vtx_name_by_code(1).is_empty());
    EXPECT_TRUE(vtx_name_by_index(0).is_empty());
    EXPECT_EQ(vtx_index_of_code(1), -1);
    EXPECT_EQ(vtx_code_by_index(0), -1);
    vtx_put_record(record_of(security(1)));
    vtx_rebuild_index();
  });
}

TEST_F(r9qvtxdb, closing_resets_everything) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  vtx_close();
  EXPECT_EQ(vtx_has_index(0), 7);
  EXPECT_NOT_OPEN(vtx_count());
  vtx_close();
  write(k_d4w_idx, index_bytes({{"A", 9, 55}}));
  EXPECT_EQ(open(), 0);
  EXPECT_EQ(vtx_count(), 1);
  EXPECT_EQ(vtx_code_by_index(0), 9);
}

TEST_F(r9qvtxdb, an_open_table_stays_when_opened_again) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  EXPECT_EQ(init_vtx("nowhere"), 8);
  EXPECT_EQ(open(), 8);
  EXPECT_EQ(vtx_count(), 3);
}

// ---- reading

TEST_F(r9qvtxdb, records_are_read_by_index_and_by_code) {
  ASSERT_EQ(open_entries({{"B", 2, offset_of(1)},
                          {"A", 1, offset_of(0)},
                          {"C", 3, offset_of(2)}}),
            0);
  VtxRecord record;
  EXPECT_EQ(vtx_read_by_index(0, record), 0);
  EXPECT_EQ(bytes_of(record), security(2, "two").bytes);
  EXPECT_EQ(vtx_read_by_index(2, record), 0);
  EXPECT_EQ(bytes_of(record), security(3, "three").bytes);
  EXPECT_EQ(vtx_read_by_code(1, record), 0);
  EXPECT_EQ(bytes_of(record), security(1, "one").bytes);
  EXPECT_EQ(vtx_read_by_code(4, record), 3);
  EXPECT_EQ(bytes_of(record), security(1, "one").bytes);
}

TEST_F(r9qvtxdb, an_index_out_of_range_has_nothing) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  VtxRecord record;
  for (const std::int32_t i : {-1, 3, 4, INT32_MIN, INT32_MAX}) {
    SCOPED_TRACE(i);
    EXPECT_EQ(vtx_read_by_index(i, record), 3);
    EXPECT_EQ(vtx_has_index(i), 3);
    EXPECT_TRUE(vtx_name_by_index(i).is_empty());
    EXPECT_EQ(vtx_code_by_index(i), -1);
  }
}

struct OffsetRow {
  std::int32_t offset;
  int read_code;
  int has_code;
};

TEST_F(r9qvtxdb, an_entry_says_where_its_record_lies) {
  constexpr OffsetRow k_rows[] = {
      {-1, 3, 3},
      {55, 0, 0},
      {offset_of(2), 0, 0},
      {offset_of(2) + 1, 5, 0},
      {offset_of(3) - 1, 5, 0},
      {offset_of(3), 5, 0},
      {1000000, 5, 0},
      {INT32_MAX, 5, 0},
      {0, 0, 0},
      {1, 0, 0},
      {54, 0, 0},
      {100, 0, 0},
  };
  for (const OffsetRow& row : k_rows) {
    SCOPED_TRACE(row.offset);
    ASSERT_EQ(open_entries({{"A", 1, row.offset}}), 0);
    VtxRecord record;
    EXPECT_EQ(vtx_read_by_index(0, record), row.read_code);
    if (row.read_code == 0) {
      EXPECT_EQ(bytes_of(record), k_three.substr(zx_size(row.offset), 1259));
    }
    EXPECT_EQ(vtx_read_by_code(1, record), row.read_code);
    EXPECT_EQ(vtx_has_index(0), row.has_code);
    EXPECT_EQ(vtx_has_code(1), row.has_code);
    vtx_close();
  }
}

TEST_F(r9qvtxdb, an_offset_below_minus_1_is_an_assertion_when_read) {
  ASSERT_EQ(open_entries({{"A", 1, -2}, {"B", 2, INT32_MIN}}), 0);
  VtxRecord record;
  for (const std::int32_t i : {0, 1}) {
    EXPECT_ASSERTION(vtx_read_by_index(i, record), "zxbfile");
    EXPECT_ASSERTION(vtx_read_by_code(i + 1, record), "zxbfile");
    EXPECT_EQ(vtx_has_index(i), 3);
    EXPECT_EQ(vtx_has_code(i + 1), 3);
  }
}

TEST_F(r9qvtxdb, a_good_record_is_read_behind_a_short_one) {
  ASSERT_EQ(open_entries({{"A", 1, offset_of(2) + 9}, {"B", 2, 55}}), 0);
  VtxRecord record;
  EXPECT_EQ(vtx_read_by_index(0, record), 5);
  EXPECT_EQ(vtx_read_by_index(1, record), 0);
  EXPECT_EQ(bytes_of(record), security(1, "one").bytes);
}

TEST_F(r9qvtxdb, of_two_entries_with_one_code_the_first_counts) {
  ASSERT_EQ(open_entries({{"A", 7, -1}, {"B", 7, offset_of(1)}}), 0);
  VtxRecord record;
  EXPECT_EQ(vtx_read_by_code(7, record), 3);
  EXPECT_EQ(vtx_index_of_code(7), 0);
  EXPECT_EQ(std_str(vtx_name_by_code(7)), "A");
  // All but this one.
  EXPECT_EQ(vtx_has_code(7), 0);
  EXPECT_EQ(vtx_has_index(0), 3);
}

TEST_F(r9qvtxdb, any_32_bit_number_is_a_code) {
  const std::int32_t k_codes[] = {0, -1, 1, INT32_MAX, INT32_MIN, 16777217};
  std::vector<Entry> entries;
  for (const std::int32_t code : k_codes)
    entries.push_back({std::to_string(code), code, 55});
  ASSERT_EQ(open_entries(entries), 0);
  for (std::int32_t i = 0; i < 6; ++i) {
    SCOPED_TRACE(k_codes[i]);
    EXPECT_EQ(vtx_index_of_code(k_codes[i]), i);
    EXPECT_EQ(vtx_code_by_index(i), k_codes[i]);
    EXPECT_EQ(std_str(vtx_name_by_code(k_codes[i])),
              std::to_string(k_codes[i]));
    EXPECT_EQ(vtx_has_code(k_codes[i]), 0);
  }
  EXPECT_EQ(vtx_index_of_code(16777216), -1);
  EXPECT_EQ(vtx_has_code(16777216), 3);
}

TEST_F(r9qvtxdb, a_name_ends_with_its_16_bytes) {
  ASSERT_EQ(open_entries({{"0123456789ABCDEF", 0x41414141, 55},
                          {"0123456789ABCDE", 2, 55},
                          {"", 3, 55},
                          {"A\0B"s, 4, 55},
                          {"\x80\xFF", 5, 55}}),
            0);
  EXPECT_EQ(std_str(vtx_name_by_index(0)), "0123456789ABCDEF");
  EXPECT_EQ(std_str(vtx_name_by_code(0x41414141)), "0123456789ABCDEF");
  EXPECT_EQ(std_str(vtx_name_by_index(1)), "0123456789ABCDE");
  EXPECT_EQ(std_str(vtx_name_by_index(2)), "");
  EXPECT_EQ(std_str(vtx_name_by_index(3)), "A");
  EXPECT_EQ(std_str(vtx_name_by_index(4)), "\x80\xFF");
  EXPECT_EQ(std_str(vtx_name_by_code(99)), "");
}

// ---- failures of the system

// A table whose last record is far from the first.
constexpr int k_far = 20;

TEST_F(r9qvtxdb, a_read_error_is_fatal) {
  write(k_d4w_idx, index_bytes({{"A", 1, offset_of(k_far - 1)}}));
  write(k_d4w_bin, data_bytes(std::vector<Record>(k_far, security(1))));
  Faults faults;
  faults.fail_nth(Call::read, 1);
  expect_file_failure(kit::failure_of([&] { open(); }), 1014,
                      "read: '" + full(k_d4w_idx) + "' operation failed",
                      full(k_d4w_idx));
  vtx_close();
  ASSERT_EQ(open(), 0);

  VtxRecord record;
  faults.fail_nth(Call::read, 1);
  expect_file_failure(kit::failure_of([&] { vtx_read_by_index(0, record); }),
                      1014, "read: '" + full(k_d4w_bin) + "' operation failed",
                      full(k_d4w_bin));
}

TEST_F(r9qvtxdb, a_failed_seek_is_fatal) {
  write(k_d4w_idx, index_bytes({{"A", 1, offset_of(k_far - 1)}}));
  write(k_d4w_bin, data_bytes(std::vector<Record>(k_far, security(1))));
  Faults faults;
  ASSERT_EQ(open(), 0);
  VtxRecord record;
  faults.fail_nth(Call::seek, 1);
  expect_file_failure(kit::failure_of([&] { vtx_read_by_index(0, record); }),
                      1012, "seek: operation failed", full(k_d4w_bin));
}

TEST_F(r9qvtxdb, a_failed_close_is_fatal_and_the_table_closed) {
  Faults faults;
  // What the closing holds when it is left was made in the same statement.
  const kit::Failure failure = kit::failure_of([&] {
    EXPECT_EQ(open_entries(k_three_entries), 0);
    faults.fail_nth(Call::close, 1);
    vtx_close();
  });
  expect_file_failure(failure, 1010, "close: '" + full(k_d4w_bin) + "' failed",
                      full(k_d4w_bin));
  EXPECT_EQ(vtx_has_index(0), 7);
  vtx_close();
  EXPECT_EQ(open(), 0);
}

TEST_F(r9qvtxdb,
       a_record_that_cannot_be_written_is_told_at_the_latest_on_close) {
  Faults faults;
  const kit::Failure failure = kit::failure_of([&] {
    EXPECT_EQ(open_entries(k_three_entries), 0);
    faults.fail_all(Call::write);
    vtx_put_record(record_of(security(2, "new")));
    vtx_close();
  });
  EXPECT_TRUE(failure.failed);
  EXPECT_TRUE(
      failure.message == "1010: close: '" + full(k_d4w_bin) + "' failed" ||
      failure.message == "1016: write: failed on '" + full(k_d4w_bin) + "'")
      << failure.message;
}

// ---- writing an index

std::vector<VtxIndexEntry> entries_of(std::size_t count) {
  std::vector<VtxIndexEntry> entries(count);
  for (std::size_t i = 0; i < count; ++i) {
    std::memset(entries[i].name, 0, sizeof entries[i].name);
    entries[i].name[0] = 'N';
    entries[i].code = static_cast<std::int32_t>(i);
    entries[i].offset = -1;
  }
  return entries;
}

TEST_F(r9qvtxdb, an_index_is_written_byte_for_byte) {
  VtxIndexEntry entries[2] = {};
  std::memcpy(entries[0].name, "0123456789ABCDEF", 16);
  entries[0].code = 0x01020304;
  entries[0].offset = -1;
  std::memcpy(entries[1].name, "B", 2);
  entries[1].code = -2;
  entries[1].offset = 55;
  write(k_d4w_idx, std::string(500, 'x'));
  vtx_write_index(str(folder.path() + "\\"), entries, 2);
  EXPECT_EQ(read(k_d4w_idx),
            "\xDD\xF0\x41\x00\x02\x00"
            "0123456789ABCDEF\x04\x03\x02\x01\xFF\xFF\xFF\xFF"
            "B\0\0\0\0\0\0\0\0\0\0\0\0\0\0\0\xFE\xFF\xFF\xFF\x37\0\0\0"s);
}

TEST_F(r9qvtxdb, what_was_written_opens) {
  write(k_d4w_bin, k_three);
  vtx_write_index(str(folder.path() + "\\"), entries_of(32767).data(), 32767);
  EXPECT_EQ(fs::file_size(folder.file(k_d4w_idx)), 6U + 24U * 32767U);
  EXPECT_EQ(open(), 0);
  EXPECT_EQ(vtx_count(), 32767);
  EXPECT_EQ(vtx_index_of_code(32766), 32766);
}

TEST_F(r9qvtxdb, a_count_of_nothing_is_written_too) {
  for (const std::int32_t count : {0, -1, -32768}) {
    SCOPED_TRACE(count);
    vtx_write_index(str(folder.path() + "\\"), nullptr, count);
    EXPECT_EQ(read(k_d4w_idx), index_head(count));
  }
}

TEST_F(r9qvtxdb, a_count_beyond_16_bits_is_an_assertion_behind_the_creation) {
  const std::vector<VtxIndexEntry> entries = entries_of(32768);
  for (const std::int32_t count : {32768, 65536 + 1, -32769, INT32_MIN}) {
    SCOPED_TRACE(count);
    write(k_d4w_idx, "old");
    EXPECT_ASSERTION(
        vtx_write_index(str(folder.path() + "\\"), entries.data(), count),
        "r9qvtxdb");
    EXPECT_EQ(read(k_d4w_idx), "");
    kit::with_failures_dropped([&] {
      vtx_write_index(str(folder.path() + "\\"), entries.data(), count);
    });
    EXPECT_EQ(read(k_d4w_idx), "");
  }
}

TEST_F(r9qvtxdb, the_directory_of_a_written_index_is_used_as_it_stands) {
  vtx_write_index(str(full("pre")), entries_of(1).data(), 1);
  EXPECT_EQ(fs::file_size(folder.file("preD4WVTX.IDX")), 30U);
  EXPECT_FALSE(exists(k_d4w_idx));
}

TEST_F(r9qvtxdb, an_index_that_cannot_be_created_is_fatal) {
  const std::vector<VtxIndexEntry> entries = entries_of(1);
  const std::string directory = full("none") + "\\";
  const std::string name = directory + k_d4w_idx;
  expect_file_failure(
      kit::failure_of(
          [&] { vtx_write_index(str(directory), entries.data(), 1); }),
      1004, "create: Can't open file '" + name + "' for writing", name);
  kit::with_failures_dropped(
      [&] { vtx_write_index(str(directory), entries.data(), 1); });
  EXPECT_FALSE(exists("none"));
}

// ---- putting records

TEST_F(r9qvtxdb, a_record_that_is_there_is_replaced_in_place) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  Record changed = security(2, "changed");
  changed.at(1159, std::string(100, '\xEE'));
  vtx_put_record(record_of(changed));
  VtxRecord record;
  EXPECT_EQ(vtx_read_by_code(2, record), 0);
  EXPECT_EQ(bytes_of(record), changed.bytes);
  vtx_close();
  EXPECT_EQ(read(k_d4w_bin),
            data_bytes({security(1, "one"), changed, security(3, "three")}));
  EXPECT_EQ(read(k_d4w_idx), index_bytes(k_three_entries));
}

// The index has to be left alone, so it may even be away.
TEST_F(r9qvtxdb, replacing_a_record_writes_no_index) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  fs::remove(folder.file(k_d4w_idx));
  vtx_put_record(record_of(security(2, "changed")));
  vtx_close();
  EXPECT_FALSE(exists(k_d4w_idx));
}

TEST_F(r9qvtxdb, a_new_record_is_appended_and_the_index_rewritten) {
  ASSERT_EQ(open_entries({{"ONE", 1, 55}, {"NEW", 9, -1}, {"NEXT", 8, -1}}), 0);
  vtx_put_record(record_of(security(9, "nine")));
  // At once, not only on closing.
  EXPECT_EQ(
      read(k_d4w_idx),
      index_bytes({{"ONE", 1, 55}, {"NEW", 9, offset_of(3)}, {"NEXT", 8, -1}}));
  vtx_put_record(record_of(security(8, "eight")));
  VtxRecord record;
  EXPECT_EQ(vtx_read_by_code(9, record), 0);
  EXPECT_EQ(bytes_of(record), security(9, "nine").bytes);
  EXPECT_EQ(vtx_read_by_index(2, record), 0);
  EXPECT_EQ(bytes_of(record), security(8, "eight").bytes);
  vtx_put_record(record_of(security(9, "nine again")));
  vtx_close();
  EXPECT_EQ(read(k_d4w_bin), k_three + security(9, "nine again").bytes +
                                 security(8, "eight").bytes);
  EXPECT_EQ(read(k_d4w_idx), index_bytes({{"ONE", 1, 55},
                                          {"NEW", 9, offset_of(3)},
                                          {"NEXT", 8, offset_of(4)}}));
}

TEST_F(r9qvtxdb, the_index_of_an_r9q_table_is_rewritten_as_d4w) {
  const std::string old_index = index_bytes({{"NEW", 9, -1}});
  write(k_r9q_idx, old_index);
  write(k_r9q_bin, data_bytes({security(1)}));
  ASSERT_EQ(open(), 0);
  vtx_put_record(record_of(security(9, "nine")));
  vtx_close();
  EXPECT_EQ(read(k_r9q_idx), old_index);
  EXPECT_EQ(read(k_d4w_idx), index_bytes({{"NEW", 9, offset_of(1)}}));
  EXPECT_EQ(read(k_r9q_bin), data_bytes({security(1), security(9, "nine")}));
  EXPECT_FALSE(exists(k_d4w_bin));
  // The new index stands ahead of the old one from now on.
  ASSERT_EQ(open(), 0);
  EXPECT_EQ(vtx_has_code(9), 0);
}

TEST_F(r9qvtxdb, a_code_is_found_in_any_decimal_form) {
  constexpr std::int32_t k_words[] = {
      5000 * 2,             // integer
      5000 * 160000 + 1,    // ten-thousandths
      5 * 16 + 13,          // thousands
      5000 * 64 * 400 + 3,  // sixty-fourths
  };
  for (const std::int32_t word : k_words) {
    SCOPED_TRACE(word);
    ASSERT_EQ(open_entries({{"A", 1, 55}, {"B", 5000, offset_of(1)}}), 0);
    Record changed = security(0, "changed");
    changed.num(0, word);
    vtx_put_record(record_of(changed));
    vtx_close();
    EXPECT_EQ(read(k_d4w_bin),
              data_bytes({security(1, "one"), changed, security(3, "three")}));
  }
}

// Every small whole number has to equal its code as a double.
TEST_F(r9qvtxdb, all_small_codes_are_found_as_ten_thousandths) {
  std::vector<Entry> entries;
  for (int i = 0; i < 9999; ++i) entries.push_back({"A", i + 1, 55});
  ASSERT_EQ(open_entries(entries), 0);
  for (int i = 1; i <= 9999; i += 7) {
    SCOPED_TRACE(i);
    Record record = security(0);
    record.num(0, i * 160000 + 1);
    vtx_put_record(record_of(record));
  }
}

TEST_F(r9qvtxdb, the_first_entry_of_a_code_is_the_one_that_is_put) {
  ASSERT_EQ(open_entries({{"A", 7, offset_of(2)}, {"B", 7, offset_of(0)}}), 0);
  vtx_put_record(record_of(security(7, "seven")));
  vtx_close();
  EXPECT_EQ(read(k_d4w_bin), data_bytes({security(1, "one"), security(2, "two"),
                                         security(7, "seven")}));
}

TEST_F(r9qvtxdb, putting_an_unknown_code_is_fatal_501) {
  ASSERT_EQ(open_entries(k_three_entries), 0);
  const VtxRecord unknown = record_of(security(4));
  EXPECT_FAILURE(vtx_put_record(unknown), "501: ", "[501-501-0/E-0/E//]");
  Record fraction = security(0);
  fraction.num(0, 603);  // 1.5
  EXPECT_FAILURE(vtx_put_record(record_of(fraction)),
                 "501: ", "[501-501-0/E-0/E//]");
  kit::with_failures_dropped([&] { vtx_put_record(unknown); });
  vtx_close();
  EXPECT_EQ(read(k_d4w_bin), k_three);
  EXPECT_EQ(read(k_d4w_idx), index_bytes(k_three_entries));
}

TEST_F(r9qvtxdb, putting_at_an_offset_below_minus_1_is_an_assertion) {
  ASSERT_EQ(open_entries({{"A", 1, -2}}), 0);
  EXPECT_ASSERTION(vtx_put_record(record_of(security(1))), "zxbfile");
}

// ---- rebuilding the index

TEST_F(r9qvtxdb, rebuilding_finds_all_records_anew) {
  write(k_d4w_idx, index_bytes({{"SEVEN", 7, 99},
                                {"NONE", 5, 55},
                                {"EIGHT", 8, -1},
                                {"EIGHT2", 8, -2}}));
  const std::string data = data_bytes({security(8), security(7, "early"),
                                       security(99), security(7, "late")}) +
                           std::string(1258, 'x');
  write(k_d4w_bin, data);
  ASSERT_EQ(open(), 0);
  vtx_rebuild_index();
  EXPECT_EQ(read(k_d4w_idx), index_bytes({{"SEVEN", 7, offset_of(3)},
                                          {"NONE", 5, -1},
                                          {"EIGHT", 8, offset_of(0)},
                                          {"EIGHT2", 8, -1}}));
  VtxRecord record;
  EXPECT_EQ(vtx_read_by_code(7, record), 0);
  EXPECT_EQ(bytes_of(record), security(7, "late").bytes);
  EXPECT_EQ(vtx_read_by_code(5, record), 3);
  EXPECT_EQ(vtx_has_index(3), 3);
  vtx_close();
  EXPECT_EQ(read(k_d4w_bin), data);
}

TEST_F(r9qvtxdb, rebuilding_an_r9q_table_writes_the_d4w_index) {
  const std::string old_index = index_bytes({{"A", 1, -1}});
  write(k_r9q_idx, old_index);
  write(k_r9q_bin, k_three);
  ASSERT_EQ(open(), 0);
  vtx_rebuild_index();
  EXPECT_EQ(read(k_r9q_idx), old_index);
  EXPECT_EQ(read(k_d4w_idx), index_bytes({{"A", 1, 55}}));
}

TEST_F(r9qvtxdb, rebuilding_reads_codes_of_every_form) {
  write(k_d4w_idx, index_bytes({{"A", 5000, -1},
                                {"B", -3, -1},
                                {"C", 2147483000, -1},
                                {"D", -2147483000, -1}}));
  write(k_d4w_bin, data_bytes({security(0).num(0, 5 * 16 + 13),
                               security(0).num(0, -3 * 160000 + 1),
                               security(0).num(0, 2147483 * 16 + 13),
                               security(0).num(0, -2147483 * 16 + 13)}));
  ASSERT_EQ(open(), 0);
  vtx_rebuild_index();
  for (int i = 0; i < 4; ++i) EXPECT_EQ(vtx_has_index(i), 0) << i;
}

TEST_F(r9qvtxdb, a_code_that_is_no_whole_32_bit_number_is_an_assertion) {
  constexpr std::int32_t k_words[] = {
      7,                   // 0.01
      603,                 // 1.5
      403,                 // one sixty-fourth
      2147484 * 16 + 13,   // 2147484000
      -2147484 * 16 + 13,  // -2147484000
      INT32_MAX - 2,       // 134217727000
  };
  for (const std::int32_t word : k_words) {
    SCOPED_TRACE(word);
    const std::string index = index_bytes({{"A", 1, 55}, {"B", 2, 99}});
    write(k_d4w_idx, index);
    write(k_d4w_bin, data_bytes({security(1), security(0).num(0, word)}));
    ASSERT_EQ(open(), 0);
    EXPECT_ASSERTION(vtx_rebuild_index(), "r9qvtxdb");
    kit::with_failures_dropped([] { vtx_rebuild_index(); });
    EXPECT_EQ(read(k_d4w_idx), index);
    vtx_close();
  }
}

TEST_F(r9qvtxdb, rebuilding_without_a_whole_head_is_fatal) {
  ASSERT_EQ(open_data(std::string(54, 'x')), 5);
  expect_file_failure(kit::failure_of([] { vtx_rebuild_index(); }), 1014,
                      "read: '" + full(k_d4w_bin) + "' operation failed",
                      full(k_d4w_bin));
}

// ---- records

TEST_F(r9qvtxdb, a_new_record_has_zero_dates_and_numbers) {
  alignas(VtxRecord) unsigned char room[sizeof(VtxRecord)];
  std::memset(room, 0xEE, sizeof room);
  const VtxRecord& record =
      *std::construct_at(reinterpret_cast<VtxRecord*>(room));
  EXPECT_EQ(zxDate(record.date).days(), 0);
  for (const HvlDecimal& number : record.num) EXPECT_EQ(number.word(), 0);
  for (const VtxDate& date : record.dates) EXPECT_EQ(zxDate(date).days(), 0);
  for (const auto& block : record.blocks)
    for (int i = 0; i < 8; ++i) EXPECT_EQ(block[i], 0);
}

TEST_F(r9qvtxdb, the_fields_lie_where_the_file_has_them) {
  Record bytes;
  bytes.date(-2).type(-3).day(0, 1000).day(11, -1000);
  bytes.num(0, 0x01020304).num(52, -7);
  const VtxRecord record = record_of(bytes);
  EXPECT_EQ(zxDate(record.date).days(), -2);
  EXPECT_EQ(record.type, -3);
  EXPECT_EQ(record.num[0].word(), 0x01020304);
  EXPECT_EQ(record.num[52].word(), -7);
  EXPECT_EQ(zxDate(record.dates[0]).days(), 1000);
  EXPECT_EQ(zxDate(record.dates[11]).days(), -1000);
}

TEST_F(r9qvtxdb, a_text_field_ends_with_its_nul) {
  Record bytes;
  for (int i = 0; i < 9; ++i) bytes.text(i, "text " + std::to_string(i));
  const VtxRecord record = record_of(bytes);
  for (int i = 0; i < 9; ++i)
    EXPECT_EQ(record.text_field(i), "text " + std::to_string(i));
  EXPECT_EQ(record_of(Record()).text_field(0), "");
}

TEST_F(r9qvtxdb, a_text_field_without_a_nul_runs_on) {
  Record bytes;
  bytes.text(0, std::string(64, 'a'));
  EXPECT_EQ(record_of(bytes).text_field(0), std::string(64, 'a'));
  bytes.text(0, std::string(65, 'a')).text(1, "bc");
  EXPECT_EQ(record_of(bytes).text_field(0), std::string(65, 'a') + "bc");
  EXPECT_EQ(record_of(bytes).text_field(1), "bc");
  // The last one runs into the numbers.
  bytes = Record().text(8, std::string(65, 'z')).num(0, 0x00434241);
  EXPECT_EQ(record_of(bytes).text_field(8), std::string(65, 'z') + "ABC");
}

TEST_F(r9qvtxdb, a_text_field_ends_with_the_record_at_the_latest) {
  // On the heap, so that a read behind the end is seen.
  const auto record = std::make_unique<VtxRecord>();
  std::memset(static_cast<void*>(record.get()), 'x', sizeof *record);
  for (int i = 0; i < 9; ++i) {
    SCOPED_TRACE(i);
    EXPECT_EQ(record->text_field(i).size(), zx_size(1259 - 4 - 65 * i));
  }
}

TEST_F(r9qvtxdb, there_are_nine_text_fields) {
  const VtxRecord record = record_of(Record().text(0, "a"));
  for (const std::int32_t i : {-1, 9, INT32_MIN, INT32_MAX}) {
    SCOPED_TRACE(i);
    EXPECT_ASSERTION(record.text_field(i), "r9qvtxdb");
    kit::with_failures_dropped(
        [&] { EXPECT_TRUE(record.text_field(i).empty()); });
  }
}

}  // namespace
