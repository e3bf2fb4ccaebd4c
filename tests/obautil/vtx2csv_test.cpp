// vtx2csv_test.cpp - tests of obautil/vtx2csv/vtx2csv.h (vtx2csv.cpp): the
// columns, the header line, the lines of records and the cleaning of texts.
// The runs of the whole program are in tests/e2e/.
#include "vtx2csv.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "kit/failure.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "obautil/table_bytes.h"

namespace {

using namespace std::string_literals;
using table_bytes::Record;

using kit::str;

VtxRecord record_of(const Record& record) {
  VtxRecord result;
  std::memcpy(static_cast<void*>(&result), record.bytes.data(), sizeof result);
  return result;
}

// What some writing leaves in a file, and how it failed, if it did.
struct Written {
  std::string bytes;
  kit::Failure failure;
};

template <class Write>
Written written(Write write) {
  const kit::TempDir folder;
  const std::string name = folder.file("out");
  Written result;
  zxBFile* file = nullptr;
  result.failure = kit::failure_of([&] {
    file = new zxBFile;
    file->create(str(name));
    write(*file);
  });
  delete file;
  result.bytes = kit::read_file(name);
  return result;
}

std::string header(std::span<const ColumnDef> columns = g_columns) {
  const Written result =
      written([&](zxBFile& out) { write_header_row(out, columns); });
  EXPECT_FALSE(result.failure.failed) << result.failure.message;
  return result.bytes;
}

Written try_row(const Record& record,
                std::span<const ColumnDef> columns = g_columns) {
  return written(
      [&](zxBFile& out) { write_record_row(record_of(record), out, columns); });
}

std::string row(const Record& record,
                std::span<const ColumnDef> columns = g_columns) {
  const Written result = try_row(record, columns);
  EXPECT_FALSE(result.failure.failed) << result.failure.message;
  return result.bytes;
}

// The cell that one column shows, without the line end.
std::string cell(const Record& record, const ColumnDef& column) {
  std::string line = row(record, std::span(&column, 1));
  EXPECT_TRUE(line.ends_with('\n'));
  line.pop_back();
  return line;
}

std::string num_cell(std::int32_t word) {
  return cell(Record().num(7, word), {"x", k_num, 7});
}
std::string text_cell(std::string_view text) {
  return cell(Record().text(2, text), {"x", k_text, 2});
}
std::string date_cell(int days) {
  return cell(Record().day(3, days), {"x", k_date, 3});
}

std::string clean(std::string_view text) {
  const zxStr cleaned = clean_text_field(str(text));
  return std::string(cleaned.view());
}

// ---- the columns

int code_number(const ColumnDef& column) { return std::stoi(column.code); }

TEST(vtx2csv, there_are_75_columns_and_the_first_is_the_code) {
  EXPECT_EQ(std::size(g_columns), 75U);
  EXPECT_STREQ(g_columns[0].code, "seccode");
  EXPECT_EQ(g_columns[0].type, k_num);
  EXPECT_EQ(g_columns[0].index, 0);
}

TEST(vtx2csv, the_codes_rise_from_37424_to_37498_without_37436) {
  std::vector<int> expected;
  for (int code = 37424; code <= 37498; ++code)
    if (code != 37436) expected.push_back(code);
  std::vector<int> codes;
  for (const ColumnDef& column : std::span(g_columns).subspan(1))
    codes.push_back(code_number(column));
  EXPECT_EQ(codes, expected);
}

TEST(vtx2csv, the_type_is_the_third_column) {
  EXPECT_STREQ(g_columns[2].code, "37425");
  EXPECT_EQ(g_columns[2].type, k_natype);
  EXPECT_EQ(g_columns[2].index, -1);
  EXPECT_EQ(std::ranges::count(g_columns, k_natype, &ColumnDef::type), 1);
}

TEST(vtx2csv, the_texts_stand_with_the_ninth_in_row_5) {
  constexpr int k_fields[] = {0, -1, 1, 2, 8, 3, 4, 5, 6, 7};
  for (int i = 0; i < 10; ++i) {
    if (k_fields[i] < 0) continue;
    SCOPED_TRACE(i);
    EXPECT_EQ(g_columns[1 + i].type, k_text);
    EXPECT_EQ(g_columns[1 + i].index, k_fields[i]);
  }
}

TEST(vtx2csv, the_decimals_49_and_52_stand_ahead_of_the_others) {
  EXPECT_EQ(g_columns[11].index, 49);
  EXPECT_EQ(g_columns[12].index, 52);
  for (int i = 13; i <= 60; ++i) {
    SCOPED_TRACE(i);
    EXPECT_EQ(g_columns[i].index, i - 12);
    EXPECT_EQ(code_number(g_columns[i]), 37436 + g_columns[i].index);
  }
  EXPECT_EQ(g_columns[61].index, 50);
  EXPECT_EQ(g_columns[62].index, 51);
  for (int i = 11; i <= 62; ++i) EXPECT_EQ(g_columns[i].type, k_num) << i;
}

TEST(vtx2csv, the_dates_stand_last) {
  for (int i = 63; i <= 74; ++i) {
    SCOPED_TRACE(i);
    EXPECT_EQ(g_columns[i].type, k_date);
    EXPECT_EQ(g_columns[i].index, i - 63);
    EXPECT_EQ(code_number(g_columns[i]), 37487 + g_columns[i].index);
  }
}

TEST(vtx2csv, every_field_of_a_record_is_shown_once) {
  for (const auto& [type, fields] :
       {std::pair(k_text + 0, 9), {k_num + 0, 53}, {k_date + 0, 12}}) {
    SCOPED_TRACE(type);
    std::multiset<int> shown;
    for (const ColumnDef& column : g_columns)
      if (column.type == type) shown.insert(column.index);
    std::multiset<int> expected;
    for (int i = 0; i < fields; ++i) expected.insert(i);
    EXPECT_EQ(shown, expected);
  }
}

// ---- the header

TEST(vtx2csv, the_header_is_one_line_with_two_line_ends) {
  std::string expected = "seccode";
  for (int code = 37424; code <= 37498; ++code)
    if (code != 37436) expected += ", " + std::to_string(code);
  EXPECT_EQ(header(), expected + "\r\n\r\n");
}

TEST(vtx2csv, the_header_of_one_column_has_no_separator) {
  const ColumnDef k_one[] = {{"a", k_num, 0}};
  EXPECT_EQ(header(k_one), "a\r\n\r\n");
}

TEST(vtx2csv, no_sign_in_a_code_is_a_format) {
  const ColumnDef k_odd[] = {{"#%t", k_num, 0}, {"$$\n", k_num, 1}};
  EXPECT_EQ(header(k_odd), "#%t, $$\n\r\n\r\n");
}

TEST(vtx2csv, a_code_that_stands_twice_is_fatal) {
  const ColumnDef k_twice[] = {
      {"37424", k_num, 0}, {"a", k_num, 1}, {"37424", k_text, 0}};
  const Written result =
      written([&](zxBFile& out) { write_header_row(out, k_twice); });
  EXPECT_TRUE(result.failure.failed);
  EXPECT_EQ(result.failure.message, "Code oba 37424 already exist");
  EXPECT_EQ(result.failure.line, "[0-0-0/E-0/E/Code oba 374/]");
  // It is found ahead of the writing.
  EXPECT_EQ(result.bytes, "37424, a, ");
}

TEST(vtx2csv, the_check_for_codes_begins_anew_with_each_header) {
  const ColumnDef k_one[] = {{"a", k_num, 0}};
  const Written result = written([&](zxBFile& out) {
    write_header_row(out, k_one);
    write_header_row(out, k_one);
  });
  EXPECT_FALSE(result.failure.failed) << result.failure.message;
  EXPECT_EQ(result.bytes, "a\r\n\r\na\r\n\r\n");
}

// ---- the lines of records

std::string times(int count, const std::string& piece) {
  std::string text;
  for (int i = 0; i < count; ++i) text += piece;
  return text;
}

TEST(vtx2csv, a_record_of_zeros_has_zeros_and_the_first_day) {
  EXPECT_EQ(row(Record()), "0, , B, " + times(8, ", ") + times(52, "0, ") +
                               times(11, "01-01-70, ") + "01-01-70\n");
}

TEST(vtx2csv, every_cell_stands_in_its_column) {
  Record record;
  record.type(1);
  for (int i = 0; i < 9; ++i) record.text(i, "t"s + static_cast<char>('a' + i));
  for (int i = 0; i < 53; ++i) record.num(i, 2 * (100 + i));
  for (int i = 0; i < 12; ++i) record.day(i, 31 + i);
  EXPECT_EQ(row(record),
            "100, ta, I, tb, tc, ti, td, te, tf, tg, th, 149, 152, "
            "101, 102, 103, 104, 105, 106, 107, 108, 109, 110, 111, 112, "
            "113, 114, 115, 116, 117, 118, 119, 120, 121, 122, 123, 124, "
            "125, 126, 127, 128, 129, 130, 131, 132, 133, 134, 135, 136, "
            "137, 138, 139, 140, 141, 142, 143, 144, 145, 146, 147, 148, "
            "150, 151, "
            "01-02-70, 02-02-70, 03-02-70, 04-02-70, 05-02-70, 06-02-70, "
            "07-02-70, 08-02-70, 09-02-70, 10-02-70, 11-02-70, 12-02-70\n");
}

// The first date, the blocks and the rest have no column.
TEST(vtx2csv, the_parts_without_a_column_are_not_shown) {
  Record record;
  record.date(9999);
  record.at(825, std::string(434, 'x'));
  EXPECT_EQ(row(record), row(Record()));
}

struct Letter {
  int type;
  char letter;
};

TEST(vtx2csv, the_type_is_a_letter_or_a_nul) {
  constexpr Letter k_rows[] = {
      {0, 'B'},   {1, 'I'},    {2, 'R'},          {3, '\0'},         {4, '\0'},
      {-1, '\0'}, {100, '\0'}, {INT16_MAX, '\0'}, {INT16_MIN, '\0'},
  };
  for (const Letter& letter : k_rows) {
    SCOPED_TRACE(letter.type);
    EXPECT_EQ(cell(Record().type(letter.type), {"x", k_natype, -1}),
              std::string(1, letter.letter));
  }
  // The NUL reaches the file in the middle of its line.
  EXPECT_EQ(row(Record().type(3)).substr(0, 10), "0, , \0, , "s);
}

struct Number {
  std::int32_t word;
  const char* text;
};

TEST(vtx2csv, numbers_are_shown_with_up_to_15_digits) {
  constexpr Number k_rows[] = {
      {0, "0"},
      {2, "1"},
      {-2, "-1"},
      {5003, "12.5"},
      {403, "0.015625"},
      {160001, "1"},
      {21, "1e-006"},
      {25, "1e-008"},
      {-7, "-1e-008"},
      {1234 * 16 + 9, "1.234e-005"},
      {17, "0.0001"},
      {29, "1000"},
      {INT32_MAX - 2, "134217727000"},
      {INT32_MIN, "-1073741824"},
  };
  for (const Number& number : k_rows) {
    SCOPED_TRACE(number.word);
    EXPECT_EQ(num_cell(number.word), number.text);
  }
}

struct Day {
  int days;
  const char* text;
};

TEST(vtx2csv, dates_are_day_month_and_year_of_two_digits) {
  constexpr Day k_rows[] = {
      {0, "01-01-70"},     {31, "01-02-70"},    {789, "29-02-72"},
      {790, "01-03-72"},   {10956, "31-12-99"}, {10957, "01-01-00"},
      {11016, "29-02-00"}, {32141, "31-12-57"},
  };
  for (const Day& day : k_rows) {
    SCOPED_TRACE(day.days);
    EXPECT_EQ(date_cell(day.days), day.text);
  }
}

TEST(vtx2csv, a_date_outside_the_calendar_is_an_assertion) {
  for (const int days : {-1, -32768, 32142, 32767}) {
    SCOPED_TRACE(days);
    const Written result = try_row(Record().day(11, days));
    EXPECT_TRUE(kit::is_assertion_of(result.failure, "zxdate"));
    EXPECT_EQ(result.bytes, "");
  }
}

TEST(vtx2csv, a_text_with_an_impossible_mark_is_an_assertion) {
  const Written result = try_row(Record().text(0, "\x80\xFD"));
  EXPECT_TRUE(kit::is_assertion_of(result.failure, "zxp2l"));
  EXPECT_EQ(result.bytes, "");
}

TEST(vtx2csv, a_column_of_unknown_type_is_fatal) {
  const ColumnDef k_columns[] = {{"a", k_num, 0}, {"b", "#money", 0}};
  const Written result = try_row(Record(), k_columns);
  EXPECT_TRUE(result.failure.failed);
  EXPECT_EQ(result.failure.message, "Unknown array type #money");
  EXPECT_EQ(result.failure.line, "[0-0-0/E-0/E/Unknown arra/]");
  EXPECT_EQ(result.bytes, "");
}

TEST(vtx2csv, rows_are_complete_and_harmless_when_failures_are_dropped) {
  const ColumnDef k_columns[] = {
      {"a", "money", 0}, {"b", k_date, 0}, {"c", k_num, 0}};
  const kit::TempDir folder;
  zxBFile out;
  ASSERT_TRUE(out.try_create(str(folder.file("out"))));
  kit::with_failures_dropped([&] {
    write_record_row(record_of(Record().day(0, -1)), out, k_columns);
  });
  ASSERT_TRUE(out.close());
  EXPECT_EQ(kit::read_file(folder.file("out")), ", , 0\n");
}

TEST(vtx2csv, a_line_is_no_format) {
  EXPECT_EQ(text_cell("a# 100%% $$ %t"), "a# 100%% $$ %t");
}

// ---- texts

TEST(vtx2csv, texts_are_cleaned) {
  EXPECT_EQ(text_cell("a\"b|c"), "ab|c");
  EXPECT_EQ(text_cell("\x81\x80"), "\xD7\x90\xD7\x91");
}

TEST(vtx2csv, a_text_without_an_end_runs_into_the_next_field) {
  const ColumnDef k_columns[] = {{"a", k_text, 2}, {"b", k_text, 3}};
  Record record;
  record.text(2, std::string(65, 'a')).text(3, "bc");
  EXPECT_EQ(row(record, k_columns), std::string(65, 'a') + "bc, bc\n");
  record = Record().text(8, std::string(65, 'a')).num(0, 0x6263);
  EXPECT_EQ(cell(record, {"x", k_text, 8}), std::string(65, 'a') + "cb");
}

TEST(vtx2csv, line_ends_in_a_text_stay) {
  EXPECT_EQ(text_cell("\x81\x80\r\n\x82"), "\xD7\x90\xD7\x91\r\n\xD7\x92");
  EXPECT_EQ(text_cell("a\nb"), "a\nb");
}

struct Cleaning {
  std::string stored;
  std::string shown;
};

TEST(vtx2csv, a_text_is_reordered_then_utf8_then_without_quotes_and_commas) {
  const Cleaning k_rows[] = {
      {"", ""},
      {"abc", "abc"},
      {"\"\"", ""},
      {",", ""},
      {"|", "|"},
      {"\"a\", |b|", "|a |b"},  // both ends are neutral and change sides
      {"'a'; (b)", "(a'; (b'"},
      {"\x82\x81\x80", "\xD7\x90\xD7\x91\xD7\x92"},
      {"\xE2\xE1\xE0", "\xD7\x90\xD7\x91\xD7\x92"},
      // The comma holds the number together and goes only then.
      {"\x81 12,345 \x80", "\xD7\x90 12345 \xD7\x91"},
      {"\x81 12\"345 \x80", "\xD7\x90 34512 \xD7\x91"},
      {"(12.5%) \x80", "\xD7\x90 (12.5%)"},
      // Marks and bytes above the letters vanish.
      {"12 abc", "abc 12"},
      {"a\xFB\xFC\xFF z", "a z"},
      {"\x9B", "\xD6\x8B"},
  };
  for (const Cleaning& cleaning : k_rows) {
    SCOPED_TRACE(cleaning.stored);
    EXPECT_EQ(clean(cleaning.stored), cleaning.shown);
  }
  EXPECT_EQ(clean("a\0\"b"s), "a\0b"s);
}

}  // namespace
