// Tests of the text form of a table: obautil/mkvtx/vtxtext.h, .cpp.
#include "vtxtext.h"

#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <string>

#include "kit/failure.h"
#include "kit/tempdir.h"

namespace {

std::string plain(const zxStr& text) { return std::string(text.view()); }

// What parsing a text comes to: "" or "line: what is wrong".
std::string verdict(std::string_view text) {
  VtxTable table;
  VtxTextError error;
  if (parse_vtx_text(text, table, error)) return "";
  return std::to_string(error.line) + ": " + plain(error.what);
}

void parse(std::string_view text, VtxTable& table) {
  VtxTextError error;
  ASSERT_TRUE(parse_vtx_text(text, table, error))
      << error.line << ": " << plain(error.what);
}

std::string name_of(const VtxIndexEntry& entry) { return entry.name; }

std::string text_of(const VtxRecord& record, int i) {
  return std::string(record.text_field(i));
}

// ---- what a text makes

TEST(vtxtext, the_head_has_its_defaults) {
  VtxTable table;
  parse("security 1", table);
  EXPECT_EQ(std::string(table.head.id, 9), "R9QVTX101");
  EXPECT_EQ(table.head.end, 0);
  EXPECT_EQ(table.head.unused, 0);
  EXPECT_EQ(table.head.stamp, 0U);
  for (const std::uint8_t byte : table.head.rest) EXPECT_EQ(byte, 0);
}

TEST(vtxtext, the_head_takes_version_and_stamp) {
  VtxTable table;
  parse("version 987\nstamp 4294967295\nsecurity 1", table);
  EXPECT_EQ(std::string(table.head.id, 9), "R9QVTX987");
  EXPECT_EQ(table.head.stamp, 4294967295U);
}

TEST(vtxtext, a_record_of_which_nothing_is_said_is_zero_but_for_its_code) {
  VtxTable table;
  parse("security 7 X", table);
  ASSERT_EQ(table.records.length(), 1);
  unsigned char expected[sizeof(VtxRecord)] = {};
  expected[589] = 14;
  EXPECT_EQ(std::memcmp(&table.records.get(0), expected, sizeof expected), 0);
}

TEST(vtxtext, each_word_sets_its_field) {
  VtxTable table;
  parse(
      "table-date 1970-01-06\n"
      "security 7 X\n"
      "type R\n"
      "text 0 first\n"
      "text 1\n"
      "text 8 last of them\n"
      "num 1 12.51\n"
      "num 52 1/64\n"
      "date 0 1970-01-02\n"
      "date 11 1970-01-03\n",
      table);
  const VtxRecord& record = table.records.get(0);
  EXPECT_EQ(zxDate(record.date).days(), 5);
  EXPECT_EQ(record.type, 2);
  EXPECT_EQ(text_of(record, 0), "first");
  EXPECT_EQ(text_of(record, 1), "");
  EXPECT_EQ(text_of(record, 8), "last of them");
  EXPECT_EQ(record.num[0].word(), 14);
  EXPECT_EQ(record.num[1].word(), 5007);
  EXPECT_EQ(record.num[52].word(), 403);
  EXPECT_EQ(zxDate(record.dates[0]).days(), 1);
  EXPECT_EQ(zxDate(record.dates[11]).days(), 2);
}

TEST(vtxtext, entries_say_where_their_records_lie) {
  VtxTable table;
  parse(
      "security 5 A\n"
      "no-record 6 B\n"
      "security 7\n"
      "no-record -8\n",
      table);
  const struct {
    const char* name;
    int code;
    int offset;
  } rows[] = {{"A", 5, 55}, {"B", 6, -1}, {"", 7, 55 + 1259}, {"", -8, -1}};
  ASSERT_EQ(table.entries.length(), 4);
  EXPECT_EQ(table.records.length(), 2);
  for (int i = 0; i < 4; ++i) {
    SCOPED_TRACE(i);
    const VtxIndexEntry& entry = table.entries.get(i);
    EXPECT_EQ(name_of(entry), rows[i].name);
    EXPECT_EQ(entry.code, rows[i].code);
    EXPECT_EQ(entry.offset, rows[i].offset);
  }
}

TEST(vtxtext, types_go_by_their_letters) {
  VtxTable table;
  parse("security 1\ntype B\nsecurity 2\ntype I\nsecurity 3\ntype R", table);
  for (int i = 0; i < 3; ++i) EXPECT_EQ(table.records.get(i).type, i);
}

TEST(vtxtext, the_code_page_is_the_dos_one_until_a_line_says_otherwise) {
  VtxTable table;
  parse(
      "security 1 \u05D0\n"
      "text 0 \u05D0\u05D1\n"
      "text-1255 1 \u05D0\u05D1\n"
      "codepage 1255\n"
      "text 2 \u05D0\u05D1\n"
      "text-862 3 \u05D0\u05D1\n"
      "security 2 \u05D0\n"
      "codepage 862\n"
      "text 0 \u05D0\u05D1\n",
      table);
  const VtxRecord& first = table.records.get(0);
  EXPECT_EQ(name_of(table.entries.get(0)), "\x80");
  EXPECT_EQ(text_of(first, 0), "\x81\x80");
  EXPECT_EQ(text_of(first, 1), "\xE1\xE0");
  EXPECT_EQ(text_of(first, 2), "\xE1\xE0");
  EXPECT_EQ(text_of(first, 3), "\x81\x80");
  EXPECT_EQ(name_of(table.entries.get(1)), "\xE0");
  EXPECT_EQ(text_of(table.records.get(1), 0), "\x81\x80");
}

TEST(vtxtext, lines_may_end_and_be_indented_in_any_way) {
  const char* const rows[] = {
      "security 1 X\nnum 1 5\n",
      "security 1 X\nnum 1 5",
      "security 1 X\r\nnum 1 5\r\n",
      "\xEF\xBB\xBFsecurity 1 X\nnum 1 5\n",
      "\n\n  security\t1\tX  \n\t num   1   5 \n\n",
      "# comment\nsecurity 1 X\n  # comment\nnum 1 5\n#",
  };
  for (const char* text : rows) {
    SCOPED_TRACE(text);
    VtxTable table;
    parse(text, table);
    EXPECT_EQ(name_of(table.entries.get(0)), "X");
    EXPECT_EQ(table.records.get(0).num[1].word(), 10);
  }
}

TEST(vtxtext, a_text_may_hold_what_elsewhere_starts_a_comment) {
  VtxTable table;
  parse("security 1\ntext 0 #x\ntext 1 a # b", table);
  EXPECT_EQ(text_of(table.records.get(0), 0), "x#");
  EXPECT_EQ(text_of(table.records.get(0), 1), "a # b");
}

TEST(vtxtext, the_code_of_a_record_may_have_another_form) {
  VtxTable table;
  parse("security 1000\nnum 0 thousands 1000\nsecurity 7\nnum 0 small 7",
        table);
  EXPECT_EQ(table.records.get(0).num[0].word(), 29);
  EXPECT_EQ(table.records.get(1).num[0].word(), 1120001);
}

TEST(vtxtext, codes_and_lengths_may_go_up_to_their_limits) {
  const std::string longest(64, 'x');
  VtxTable table;
  parse("security 1000000000 123456789012345\ntext 8 " + longest +
            "\nsecurity -1000000000\n",
        table);
  EXPECT_EQ(table.records.get(0).num[0].word(), 2000000000);
  EXPECT_EQ(table.records.get(1).num[0].word(), -2000000000);
  EXPECT_EQ(name_of(table.entries.get(0)), "123456789012345");
  EXPECT_EQ(text_of(table.records.get(0), 8), longest);
}

// ---- errors

constexpr char k_too_long[] =
    "text 0 "
    "12345678901234567890123456789012345678901234567890123456789012345";

TEST(vtxtext, an_error_names_its_line_and_what_is_wrong) {
  const struct {
    const char* text;
    const char* verdict;
  } rows[] = {
      {"", "1: the table has no security with a record"},
      {"\n\n# nothing\n", "3: the table has no security with a record"},
      {"no-record 1", "1: the table has no security with a record"},
      {"foo 1", "1: unknown word 'foo'"},
      {"security 1\n\nText 1 x", "3: unknown word 'Text'"},
      {"security 1\r\n\xFF", "2: the line is not UTF-8"},
      {"# \xC3\xA9 and \xC3", "1: the line is not UTF-8"},

      {"codepage", "1: '' is no code page: 862 or 1255"},
      {"codepage 1252", "1: '1252' is no code page: 862 or 1255"},
      {"table-date 2026-02-30",
       "1: '2026-02-30' is no date from 1970-01-01 to 2057-12-31"},
      {"version 100", "1: '100' is no whole number from 101 to 999"},
      {"version 1000", "1: '1000' is no whole number from 101 to 999"},
      {"stamp 4294967296",
       "1: '4294967296' is no whole number from 0 to 4294967295"},
      {"stamp -1", "1: '-1' is no whole number from 0 to 4294967295"},
      {"security 1\nversion 101",
       "2: 'version' must stand ahead of the first entry"},
      {"no-record 1\nstamp 1",
       "2: 'stamp' must stand ahead of the first entry"},
      {"security 1\ntable-date 2000-01-01",
       "2: 'table-date' must stand ahead of the first entry"},

      {"security", "1: '' is no whole number from -1000000000 to 1000000000"},
      {"security X",
       "1: 'X' is no whole number from -1000000000 to 1000000000"},
      {"security 1000000001",
       "1: '1000000001' is no whole number from -1000000000 to 1000000000"},
      {"no-record -1000000001",
       "1: '-1000000001' is no whole number from -1000000000 to 1000000000"},
      {"security 1 1234567890123456",
       "1: the text has 16 characters, 15 can be stored"},
      {"no-record 1 \xE2\x82\xAC", "1: the character U+20AC can't be stored"},
      {"security 1\nsecurity 2\nno-record 1",
       "3: the code 1 stands in line 1 already"},
      {"no-record 5\n\nsecurity +05", "3: the code 5 stands in line 1 already"},

      {"type B", "1: 'type' must stand below a 'security'"},
      {"text 0 x", "1: 'text' must stand below a 'security'"},
      {"text-862 0 x", "1: 'text-862' must stand below a 'security'"},
      {"text-1255 0 x", "1: 'text-1255' must stand below a 'security'"},
      {"num 0 1", "1: 'num' must stand below a 'security'"},
      {"date 0 2000-01-01", "1: 'date' must stand below a 'security'"},
      {"security 1\nno-record 2\ntext 0 x",
       "3: 'text' must stand below a 'security'"},

      {"security 1\ntype", "2: '' is no type: B, I or R"},
      {"security 1\ntype b", "2: 'b' is no type: B, I or R"},
      {"security 1\ntype 3", "2: '3' is no type: B, I or R"},
      {"security 1\ntype B\ntype B", "3: type is given twice"},
      {"security 1\ntext", "2: '' is no whole number from 0 to 8"},
      {"security 1\ntext 9 x", "2: '9' is no whole number from 0 to 8"},
      {"security 1\ntext -1 x", "2: '-1' is no whole number from 0 to 8"},
      {"security 1\ntext x", "2: 'x' is no whole number from 0 to 8"},
      {"security 1\ntext 3 x\ntext-862 3 y", "3: text 3 is given twice"},
      {"security 1\ntext 3\ntext 3", "3: text 3 is given twice"},
      {"security 1\ntext 0 a\x02", "2: the character U+0002 can't be stored"},
      {"security 1\nnum 53 1", "2: '53' is no whole number from 0 to 52"},
      {"security 1\nnum 1", "2: '' is no number"},
      {"security 1\nnum 1 100000000000",
       "2: '100000000000' is out of range: the limit is 100000000000"},
      {"security 1\nnum 52 1\nnum 52 1", "3: num 52 is given twice"},
      {"security 1\nnum 0 2", "2: num 0 must be the security's code"},
      {"security 1\ndate 12 2000-01-01",
       "2: '12' is no whole number from 0 to 11"},
      {"security 1\ndate 0 2000-13-01",
       "2: '2000-13-01' is no date from 1970-01-01 to 2057-12-31"},
      {"security 1\ndate 11 2000-01-01\ndate 11 2000-01-01",
       "3: date 11 is given twice"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    EXPECT_EQ(verdict(row.text), row.verdict);
  }
  EXPECT_EQ(verdict(std::string("security 1\n") + k_too_long),
            "2: the text has 65 characters, 64 can be stored");
}

TEST(vtxtext, what_one_record_has_the_next_may_have_too) {
  EXPECT_EQ(verdict("security 1\ntype B\ntext 1 x\nnum 1 1\n"
                    "date 1 2000-01-01\n"
                    "security 2\ntype B\ntext 1 x\nnum 1 1\n"
                    "date 1 2000-01-01\n"),
            "");
}

TEST(vtxtext, a_table_holds_32767_entries_and_no_more) {
  std::string text = "security 0\n";
  for (int i = 1; i < 32767; ++i) {
    text += "no-record " + std::to_string(i) + "\n";
  }
  VtxTable table;
  parse(text, table);
  EXPECT_EQ(table.entries.length(), 32767);
  EXPECT_EQ(verdict(text + "no-record 40000\n"),
            "32768: more than 32767 entries");
  EXPECT_EQ(verdict(text + "security 40000\n"),
            "32768: more than 32767 entries");
}

TEST(vtxtext, a_damaged_text_gives_a_table_or_an_error_with_a_line) {
  const std::string good =
      "table-date 2000-01-01\nversion 102\nstamp 5\ncodepage 1255\n"
      "security 1 \u05D0\u05D1\ntype I\ntext 1 \"\u05D0 abc (12.5%)\"\n"
      "num 1 12 3/64\nnum 2 hundredths 0.01\nnum 3 0x7\ndate 0 2000-02-29\n"
      "no-record 2 X\n";
  constexpr char k_bytes[] = "\0\n\r\t \"#/.-0129xB\xD7\x90\xFF\xE2";
  std::mt19937 random(1);
  int errors = 0;
  for (int run = 0; run < 20000; ++run) {
    std::string text = good;
    for (unsigned n = random() % 4 + 1; n > 0; --n)
      text[random() % text.size()] = k_bytes[random() % (sizeof k_bytes - 1)];
    if (random() % 8 == 0) text.resize(random() % text.size());
    VtxTable table;
    VtxTextError error;
    if (parse_vtx_text(text, table, error)) {
      EXPECT_GT(table.records.length(), 0);
      continue;
    }
    ++errors;
    EXPECT_GE(error.line, 1);
    EXPECT_LE(error.line, 20);
    EXPECT_FALSE(error.what.is_empty());
  }
  EXPECT_GT(errors, 1000);
}

// ---- files

TEST(vtxtext, a_file_is_read_whole) {
  const kit::TempDir folder;
  const std::string path = folder.file("t.txt");
  std::string text;
  for (int i = 0; i < 20000; ++i) {
    text += "security " + std::to_string(i) + "\n";
  }
  kit::write_file(path, text);
  VtxTable table;
  EXPECT_TRUE(load_vtx_text(path.c_str(), table));
  ASSERT_EQ(table.entries.length(), 20000);
  EXPECT_EQ(table.entries.get(19999).code, 19999);
}

// A short name is shown as given; that is seen where the program runs, in
// mkvtx_e2e.
TEST(vtxtext, an_error_in_a_file_is_fatal_and_names_it_without_long_folders) {
  const kit::TempDir folder;
  const std::string path =
      folder.file("a-long-name-for-a-file-that-leaves-no-room-for-more.txt");
  kit::write_file(path, "security 1\n\nfoo");
  const zxStr name = path.c_str();
  VtxTable table;
  EXPECT_FAILURE(load_vtx_text(name, table),
                 "a-long-name-for-a-file-that-leaves-no-room-for-more.txt(3): "
                 "unknown word 'foo'",
                 "[0-0-0/E-0/E/a-long-name-/]");
}

TEST(vtxtext, a_file_that_is_not_there_is_fatal) {
  const kit::TempDir folder;
  const std::string path = folder.file("none.txt");
  const zxStr name = path.c_str();
  VtxTable table;
  const kit::Failure failure =
      kit::failure_of([&] { load_vtx_text(name, table); });
  EXPECT_EQ(failure.exit_code, 100);
  EXPECT_EQ(failure.message.substr(0, 6), "1002: ") << failure.message;
  EXPECT_NE(failure.message.find(path), std::string::npos) << failure.message;
}

TEST(vtxtext, a_dropped_failure_makes_no_table) {
  const kit::TempDir folder;
  const std::string path = folder.file("none.txt");
  VtxTable table;
  kit::with_failures_dropped(
      [&] { EXPECT_FALSE(load_vtx_text(path.c_str(), table)); });
  EXPECT_EQ(table.entries.length(), 0);
}

}  // namespace
