// zxsfmt_table_test.cpp - every directive of the format language by every tag
// of an argument: what it shows, or that it fails.
// Tests zxlib/zxsfmt.h and zxsfmt*.cpp.
#include <gtest/gtest.h>

#include <cstdint>
#include <ctime>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "format_run.h"
#include "kit/failure.h"
#include "kit/text.h"
#include "zxsfmt.h"

namespace {

using format_run::bad;
using format_run::compose;
using format_run::good;
using kit::text_of;

using Texts = std::map<std::uint32_t, std::string>;

constexpr const char* k_address =
    sizeof(void*) == 8 ? "00000000DEADBEE0" : "DEADBEE0";

// One argument of every tag.  The moments are 2009-03-07 14:05:06 UTC, the
// zone is UTC.
class Arguments {
 public:
  Arguments() {
    texts.append(zxStr("one"));
    texts.append(zxStr("two"));
    date.set(2009, 3, 7);
    time.set_time_t(moment);
    table.ref("name") = "entry";
    list.push_back(zxFmtArg(5));
    records = {
        -7,
        65L,
        4294967295U,
        250UL,
        '\xE0',
        static_cast<unsigned char>(200),
        format_run::boolean(true),
        1.5,
        "abc",
        string,
        zxFmtArg(zxFmtArg::k_text, &string),
        date,
        time,
        static_cast<const std::time_t*>(&moment),
        texts,
        reinterpret_cast<const void*>(std::uintptr_t{0xDEADBEE0}),
        table,
        format_run::list_of(list),  // there is nobody who takes from it
        format_run::nothing(),
    };
  }
  Arguments(const Arguments&) = delete;
  Arguments& operator=(const Arguments&) = delete;

  std::vector<zxFmtArg> records;

 private:
  const zxStr string = "xyz";
  zxDate date;
  zxTime time;
  const std::time_t moment = 1'236'434'706;
  zxQVA<zxStr> texts;
  zxSA<zxStr> table;
  format_run::List list;
  const format_run::InZone zone{"UTC0"};
};

TEST(zxsfmt_table, there_is_an_argument_of_every_tag) {
  std::string tags;
  for (const zxFmtArg& record : Arguments().records)
    tags += static_cast<char>(record.tag);
  EXPECT_EQ(tags, std::string("iluvcbBfzs\1tMmkp\3\4\0", 19));
}

// Composes a directive between an "a" and a "b" with each argument: those
// that have a text show it, the others leave the format as it stands.
void expect_texts(const std::string& directive, const Texts& texts) {
  const Arguments arguments;
  const std::string format = "a" + directive + "b\n";
  for (const zxFmtArg& record : arguments.records) {
    const auto found = texts.find(record.tag);
    EXPECT_EQ(compose(format.c_str(), record),
              found == texts.end() ? bad(format)
                                   : good("a" + found->second + "b\r\n"))
        << directive << " of tag " << record.tag;
  }
}

// ---- the table

struct Row {
  const char* directive;
  Texts texts;
};

const std::vector<Row>& rows() {
  static const std::vector<Row> k_rows = {
      // whole numbers: the 32 bits of the value, signed or not
      {"%d",
       {{'i', "-7"},
        {'l', "65"},
        {'u', "-1"},
        {'v', "250"},
        {'c', "-32"},
        {'b', "200"},
        {'B', "1"}}},
      {"%i",
       {{'i', "-7"},
        {'l', "65"},
        {'u', "-1"},
        {'v', "250"},
        {'c', "-32"},
        {'b', "200"},
        {'B', "1"}}},
      {"%u",
       {{'i', "4294967289"},
        {'l', "65"},
        {'u', "4294967295"},
        {'v', "250"},
        {'c', "4294967264"},
        {'b', "200"},
        {'B', "1"}}},
      {"%o",
       {{'i', "37777777771"},
        {'l', "101"},
        {'u', "37777777777"},
        {'v', "372"},
        {'c', "37777777740"},
        {'b', "310"},
        {'B', "1"}}},
      {"%x",
       {{'i', "fffffff9"},
        {'l', "41"},
        {'u', "ffffffff"},
        {'v', "fa"},
        {'c', "ffffffe0"},
        {'b', "c8"},
        {'B', "1"}}},
      {"%X",
       {{'i', "FFFFFFF9"},
        {'l', "41"},
        {'u', "FFFFFFFF"},
        {'v', "FA"},
        {'c', "FFFFFFE0"},
        {'b', "C8"},
        {'B', "1"}}},

      // the character of a number's lowest byte
      {"%c",
       {{'i', "\xF9"},
        {'l', "A"},
        {'u', "\xFF"},
        {'v', "\xFA"},
        {'c', "\xE0"},
        {'b', "\xC8"}}},

      // doubles
      {"%e", {{'f', "1.500000e+000"}}},
      {"%E", {{'f', "1.500000E+000"}}},
      {"%f", {{'f', "1.500000"}}},
      {"%g", {{'f', "1.5"}}},
      {"%G", {{'f', "1.5"}}},

      // the rest
      {"%p", {{'p', k_address}}},
      {"%s", {{'z', "abc"}, {'s', "xyz"}}},
      {"%z", {{'z', "abc"}}},
      {"%h", {{'z', "cba"}, {'s', "zyx"}}},
      {"%L", {{'k', "one two"}}},
      {"%T", {{'M', "07-03-09 14:05:06"}, {'m', "07-03-09 14:05:06"}}},
      {"%t", {{'t', "07-03-09"}, {'M', "07-03-09"}}},

      // numbers by pictures, "," without one
      {"%v",
       {{'i', "-7.00"},
        {'l', "65.00"},
        {'u', "4,294,967,295"},
        {'v', "250.0"},
        {'c', "-32.00"},
        {'b', "200.0"},
        {'f', "1.5000"}}},

      // the letters that take a bracket
      {"%[%Y]t", {{'t', "2009"}, {'M', "2009"}, {'m', "2009"}}},
      {"%[]t", {{'t', ""}, {'M', ""}, {'m', ""}}},
      {"%[%Y]T", {{'M', "07-03-09 14:05:06"}, {'m', "07-03-09 14:05:06"}}},
      {"%[]T", {{'M', "07-03-09 14:05:06"}, {'m', "07-03-09 14:05:06"}}},
      {"%[]v",
       {{'i', "-7.00"},
        {'l', "65.00"},
        {'u', "4294967295"},
        {'v', "250.0"},
        {'c', "-32.00"},
        {'b', "200.0"},
        {'f', "1.5000"}}},
      {"%[pa]v",
       {{'i', "700%"},
        {'l', "6500%"},
        {'u', "429496729500%"},
        {'v', "25000%"},
        {'c', "3200%"},
        {'b', "20000%"},
        {'f', "150.0%"}}},
  };
  return k_rows;
}

TEST(zxsfmt_table, each_directive_of_each_tag) {
  for (const Row& row : rows()) expect_texts(row.directive, row.texts);
}

constexpr std::string_view k_letters = "diouxXceEfgGpszhLTtv";

TEST(zxsfmt_table, the_table_has_every_letter) {
  std::string found;
  for (const Row& row : rows())
    if (row.directive[1] != '[') found += row.directive[1];
  for (const char letter : k_letters)
    EXPECT_NE(found.find(letter), found.npos) << letter;
  EXPECT_EQ(found.size(), k_letters.size());
}

TEST(zxsfmt_table, a_bracket_fails_with_every_other_letter) {
  for (const char letter : k_letters) {
    if (letter == 'T' || letter == 't' || letter == 'v') continue;
    expect_texts(std::string("%[]") + letter, {});
    expect_texts(std::string("%5[%Y]") + letter, {});
  }
}

// What can stand ahead of the letter, and the directives of environments.
constexpr std::string_view k_no_letters = " #+-.*[l0123456789<>%";

TEST(zxsfmt_table, every_other_letter_fails) {
  int count = 0;
  for (int byte = 1; byte < 256; ++byte) {
    const char letter = static_cast<char>(byte);
    if (k_letters.find(letter) != k_letters.npos) continue;
    if (k_no_letters.find(letter) != k_no_letters.npos) continue;
    expect_texts(std::string("%") + letter, {});
    expect_texts(std::string("%-5.2[x]l") + letter, {});
    ++count;
  }
  EXPECT_EQ(count, 255 - 20 - 21);
}

// Behind one of what can stand ahead of it, the same byte is a letter.
TEST(zxsfmt_table, what_stands_ahead_of_a_letter_is_none_itself) {
  for (const char* directive :
       {"%ll", "%.5.", "%[][", "%[]*", "%5#", "%.3 ", "%1+", "%5*", "%l5",
        "%l-", "%5<", "%->", "% %", "%0%", "%.%", "%[]%", "%l%"}) {
    expect_texts(directive, {});
  }
}

TEST(zxsfmt_table, no_directive_goes_without_an_argument) {
  for (const Row& row : rows()) {
    const std::string format = "a" + std::string(row.directive) + "b\n";
    EXPECT_EQ(compose(format.c_str()), bad(format)) << row.directive;
  }
}

// ---- default forms

TEST(zxsfmt_table, each_default_form) {
  const Texts texts = {
      {'i', "-7"},
      {'l', "65"},
      {'u', "4294967295"},
      {'v', "250"},
      {'c', "\xE0"},
      {'b', "\\xc8"},
      {'B', "true"},
      {'f', "1.5"},
      {'z', "abc"},
      {'s', "xyz"},
      {zxFmtArg::k_text, "xyz"},
      {'t', "07-03-09"},
      {'M', "07-03-2009 14:05:06"},
      {'m', "07-03-09 14:05:06"},
      {'k', "one two"},
      {'p', k_address},
  };
  const Arguments arguments;
  int count = 0;
  for (const zxFmtArg& record : arguments.records) {
    const auto found = texts.find(record.tag);
    if (found == texts.end()) continue;
    EXPECT_EQ(compose("a#b\n", record), good("a" + found->second + "b\r\n"))
        << record.tag;
    ++count;
  }
  EXPECT_EQ(count, 16);
}

TEST(zxsfmt_table, false_is_the_other_boolean) {
  EXPECT_EQ(compose("#", format_run::boolean(false)), good("false"));
  EXPECT_EQ(compose("%d", format_run::boolean(false)), good("0"));
}

TEST(zxsfmt_table, a_list_nobody_takes_from_is_a_missing_argument) {
  format_run::List list = {zxFmtArg(1)};
  EXPECT_EQ(compose("a#b", format_run::list_of(list)), bad("a#b"));
  EXPECT_EQ(compose("a%*db", format_run::list_of(list)), bad("a"));
}

TEST(zxsfmt_table, void_and_a_table_have_no_default_form_by_assertion) {
  const zxSA<zxStr> table;
  EXPECT_SFMT_ASSERTION(compose("#", format_run::nothing()));
  EXPECT_SFMT_ASSERTION(compose("#", table));
}

// A record of a tag that nobody knows.
TEST(zxsfmt_table, an_unknown_tag_fits_nothing) {
  for (const std::uint32_t tag : {2U, 5U, 'a' + 0U, 'd' + 0U, 0x6900U, ~0U}) {
    const zxFmtArg record(tag, nullptr);
    EXPECT_SFMT_ASSERTION(compose("a#b", record));
    for (const Row& row : rows()) {
      const std::string format = "a" + std::string(row.directive) + "b\n";
      EXPECT_EQ(compose(format.c_str(), record), bad(format))
          << row.directive << " of tag " << tag;
    }
  }
}

// ---- the word that blanks

// The words are looked at ahead of the letter and its bracket.
TEST(zxsfmt_table, a_plain_text_err_or_void_blanks_under_every_letter) {
  for (const char* word : {"err", "void"}) {
    for (int byte = 1; byte < 256; ++byte) {
      const char letter = static_cast<char>(byte);
      if (k_no_letters.find(letter) != k_no_letters.npos) continue;
      const std::string format = std::string("a #%-5.2[x]l") + letter + " b";
      EXPECT_EQ(compose(format.c_str(), 1, word),
                good(std::string(word) + " b"))
          << letter;
    }
  }
}

}  // namespace
