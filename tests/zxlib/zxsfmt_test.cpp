// zxsfmt_test.cpp - the format language: directives and default forms, bad
// formats, the entries that write or fail, and the text of doubles against a
// model.
// Tests zxlib/zxsfmt.h, zxsfmt.cpp and zxsfmt_number.cpp.
#include "zxsfmt.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <random>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "zxmainf.h"

namespace {

using kit::read_file;
using kit::TempDir;
using namespace std::string_literals;

using kit::text_of;

// What the core makes of a format and its arguments.
struct Composed {
  bool good;
  std::string text;

  friend bool operator==(const Composed&, const Composed&) = default;
};

std::ostream& operator<<(std::ostream& out, const Composed& composed) {
  return out << (composed.good ? "good '" : "bad '") << composed.text << "'";
}

template <class... Args>
Composed compose(const char* format, const Args&... args) {
  const std::array<zxFmtArg, sizeof...(Args)> list{zxFmtArg(args)...};
  zxStr out = "to be dropped";
  const bool good = sfmt_core(
      out, format, static_cast<std::int32_t>(list.size()), list.data());
  return {good, text_of(out)};
}

Composed good(std::string text) { return {true, std::move(text)}; }
Composed bad(std::string text) { return {false, std::move(text)}; }

// ---- which types have a form

enum Plain { k_plain };
enum class Scoped { one };
struct Other {};
struct Convertible {
  operator double() const { return 1.5; }
};

static_assert(std::is_constructible_v<zxFmtArg, int>);
static_assert(std::is_constructible_v<zxFmtArg, const int&>);
static_assert(std::is_constructible_v<zxFmtArg, char>);
static_assert(std::is_constructible_v<zxFmtArg, double>);
static_assert(std::is_constructible_v<zxFmtArg, const char*>);
static_assert(std::is_constructible_v<zxFmtArg, char*>);
static_assert(std::is_constructible_v<zxFmtArg, const char (&)[4]>);
static_assert(std::is_constructible_v<zxFmtArg, const zxStr&>);
static_assert(std::is_constructible_v<zxFmtArg, const zxDate&>);

static_assert(!std::is_constructible_v<zxFmtArg, bool>);
static_assert(!std::is_constructible_v<zxFmtArg, signed char>);
static_assert(!std::is_constructible_v<zxFmtArg, unsigned char>);
static_assert(!std::is_constructible_v<zxFmtArg, wchar_t>);
static_assert(!std::is_constructible_v<zxFmtArg, char16_t>);
static_assert(!std::is_constructible_v<zxFmtArg, short>);
static_assert(!std::is_constructible_v<zxFmtArg, unsigned short>);
static_assert(!std::is_constructible_v<zxFmtArg, unsigned>);
static_assert(!std::is_constructible_v<zxFmtArg, long>);
static_assert(!std::is_constructible_v<zxFmtArg, unsigned long>);
static_assert(!std::is_constructible_v<zxFmtArg, long long>);
static_assert(!std::is_constructible_v<zxFmtArg, unsigned long long>);
static_assert(!std::is_constructible_v<zxFmtArg, float>);
static_assert(!std::is_constructible_v<zxFmtArg, long double>);
static_assert(!std::is_constructible_v<zxFmtArg, void*>);
static_assert(!std::is_constructible_v<zxFmtArg, const int*>);
static_assert(!std::is_constructible_v<zxFmtArg, Scoped>);
static_assert(!std::is_constructible_v<zxFmtArg, Other>);
static_assert(!std::is_constructible_v<zxFmtArg, std::string>);
static_assert(!std::is_constructible_v<zxFmtArg, std::string_view>);

// These convert to a double by themselves, whose place would be gone by the
// time that the record is read.
TEST(zxsfmt, what_converts_to_a_double_has_no_form_of_its_own) {
  EXPECT_FALSE((std::is_constructible_v<zxFmtArg, Plain>));
  EXPECT_FALSE((std::is_constructible_v<zxFmtArg, Convertible>));
}

// ---- plain text

TEST(zxsfmt, plain_text_stands_for_itself) {
  EXPECT_EQ(compose(""), good(""));
  EXPECT_EQ(compose("abc"), good("abc"));
  EXPECT_EQ(compose("\t\r\x01\x7F\x80\xE0\xFF\"\\{}&@!"),
            good("\t\r\x01\x7F\x80\xE0\xFF\"\\{}&@!"));
  const std::string large(100'000, 'x');
  EXPECT_EQ(compose(large.c_str()), good(large));
}

TEST(zxsfmt, doubled_marks_are_one) {
  EXPECT_EQ(compose("##"), good("#"));
  EXPECT_EQ(compose("%%"), good("%"));
  EXPECT_EQ(compose("$$"), good("$"));
  EXPECT_EQ(compose("100%%"), good("100%"));
  EXPECT_EQ(compose("####%%%%$$$$"), good("##%%$$"));
  EXPECT_EQ(compose("a##b$$c%%d"), good("a#b$c%d"));
  EXPECT_EQ(compose("###", "x"), good("#x"));
  EXPECT_EQ(compose("#%%", "x"), good("x%"));
  EXPECT_EQ(compose("##t"), good("#t"));
  EXPECT_EQ(compose("%%t"), good("%t"));
}

TEST(zxsfmt, a_line_feed_of_the_format_is_two_bytes) {
  EXPECT_EQ(compose("\n"), good("\r\n"));
  EXPECT_EQ(compose("a\nb"), good("a\r\nb"));
  EXPECT_EQ(compose("\n\n"), good("\r\n\r\n"));
  EXPECT_EQ(compose("a\r\nb\r"), good("a\r\r\nb\r"));
  EXPECT_EQ(compose("#\n", 1), good("1\r\n"));
}

TEST(zxsfmt, a_line_feed_of_an_argument_stays) {
  EXPECT_EQ(compose("#", "a\nb"), good("a\nb"));
  EXPECT_EQ(compose("#", zxStr("a\nb\r\n")), good("a\nb\r\n"));
  EXPECT_EQ(compose("#", '\n'), good("\n"));
  EXPECT_EQ(compose("#\n", "\n"), good("\n\r\n"));
}

// ---- default forms

TEST(zxsfmt, whole_numbers_are_decimal) {
  EXPECT_EQ(compose("#", 0), good("0"));
  EXPECT_EQ(compose("#", -1), good("-1"));
  EXPECT_EQ(compose("#", 1234567), good("1234567"));
  EXPECT_EQ(compose("#", INT32_MAX), good("2147483647"));
  EXPECT_EQ(compose("#", INT32_MIN), good("-2147483648"));
}

TEST(zxsfmt, a_character_is_that_byte) {
  for (int byte = 0; byte < 256; ++byte) {
    const char c = static_cast<char>(byte);
    EXPECT_EQ(compose("<#>", c), good("<"s + c + ">")) << byte;
  }
}

TEST(zxsfmt, texts_and_strings_are_as_they_are) {
  EXPECT_EQ(compose("#, ", "x"), good("x, "));
  EXPECT_EQ(compose("#", ""), good(""));
  EXPECT_EQ(compose("<#>", zxStr()), good("<>"));
  char changeable[] = "abc";
  EXPECT_EQ(compose("##", changeable), bad("#"));
  EXPECT_EQ(compose("#", changeable), good("abc"));
  const std::string large(200'000, 'y');
  EXPECT_EQ(compose("<#>", large.c_str()), good("<" + large + ">"));
}

TEST(zxsfmt, a_string_keeps_its_nul_bytes_and_a_text_ends_at_one) {
  EXPECT_EQ(compose("<#>", zxStr("a\0b\0", 4)), good("<a\0b\0>"s));
  EXPECT_EQ(compose("<#>", "a\0b"), good("<a>"));
}

TEST(zxsfmt, an_argument_is_never_read_as_a_format) {
  EXPECT_EQ(compose("# #", "%t#$%%", zxStr("##$0%s")), good("%t#$%% ##$0%s"));
}

TEST(zxsfmt, doubles_have_their_form) {
  EXPECT_EQ(compose("#", 1.5), good("1.5"));
  EXPECT_EQ(compose("# #", 1e15, -0.25), good("1e+015 -0.25"));
}

TEST(zxsfmt, dates_have_their_form_by_both_directives) {
  const zxDate date = zxDate::from_stored(14300);
  EXPECT_EQ(compose("#", date), good("25-02-09"));
  EXPECT_EQ(compose("%t", date), good("25-02-09"));
  EXPECT_EQ(compose("%t#%tt", date, zxDate(), date),
            good("25-02-0901-01-7025-02-09t"));
}

TEST(zxsfmt, a_date_outside_of_the_calendar_fails_an_assertion) {
  const zxDate never = zxDate::from_stored(-1);
  EXPECT_ASSERTION(sfmt("#", never), "zxdate");
  EXPECT_ASSERTION(sfmt("%t", never), "zxdate");
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(text_of(sfmt("<#>", never)), "<>"); });
}

TEST(zxsfmt, a_null_text_fails_an_assertion) {
  const char* null = nullptr;
  EXPECT_ASSERTION(sfmt("#", null), "zxstr");
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(text_of(sfmt("<#>", null)), "<>"); });
}

TEST(zxsfmt, arguments_are_taken_in_their_order) {
  EXPECT_EQ(compose("#: # (%t) #", 12, zxStr("name"), zxDate(), 'c'),
            good("12: name (01-01-70) c"));
}

// ---- bad formats

TEST(zxsfmt, a_missing_argument_leaves_the_rest_of_the_format) {
  EXPECT_EQ(compose("#"), bad("#"));
  EXPECT_EQ(compose("a#b"), bad("a#b"));
  EXPECT_EQ(compose("a#b#c##\n", 1), bad("a1b#c##\n"));
  EXPECT_EQ(compose("a%tb"), bad("a%tb"));
  EXPECT_EQ(compose("\n#\n"), bad("\r\n#\n"));
}

TEST(zxsfmt, an_argument_too_many_gives_the_whole_text_and_fails) {
  EXPECT_EQ(compose("abc\n", 1), bad("abc\r\n"));
  EXPECT_EQ(compose("", 1), bad(""));
  EXPECT_EQ(compose("# #", 1, 2, 3), bad("1 2"));
}

TEST(zxsfmt, an_unknown_directive_leaves_the_rest_of_the_format) {
  const char* rows[] = {"%",
                        "%y",
                        "% y",
                        "%Q#",
                        "%\n",
                        "%#",
                        "$",
                        "$y",
                        "$Q",
                        "$ ",
                        "$#",
                        "$\x80",
                        "%y %% ## $$ # %t\n"};
  for (const char* row : rows) {
    const std::string format = "a#b" + std::string(row);
    EXPECT_EQ(compose(format.c_str(), 1), bad("a1b" + std::string(row))) << row;
  }
}

TEST(zxsfmt, an_unknown_directive_fails_with_an_argument_as_well) {
  EXPECT_EQ(compose("%y #", 1, 2), bad("%y #"));
  EXPECT_EQ(compose("<$y #>", 1, 2), bad("<$y #>"));
}

TEST(zxsfmt, a_date_directive_takes_nothing_but_a_date) {
  EXPECT_EQ(compose("<%t>", 1), bad("<%t>"));
  EXPECT_EQ(compose("<%t>", "01-01-70"), bad("<%t>"));
  EXPECT_EQ(compose("<%t>", 1.5), bad("<%t>"));
  EXPECT_EQ(compose("<%t>", zxStr("x")), bad("<%t>"));
  EXPECT_EQ(compose("<%t> #", 'c', zxDate()), bad("<%t> #"));
}

// ---- the entry that gives a text

TEST(zxsfmt, sfmt_gives_the_text) {
  EXPECT_EQ(text_of(sfmt("a # b\n", 5)), "a 5 b\r\n");
  EXPECT_EQ(text_of(sfmt("")), "");
}

TEST(zxsfmt, a_bad_format_is_fatal_with_the_position) {
  zx_pos = {"place.cpp", 77};
  EXPECT_FAILURE(sfmt("#"), "2006: fmt err (place.cpp:77)",
                 "[2006-2006-0/E-0/E/place.cpp:77/]");
  EXPECT_FAILURE(sfmt("a", 1), "2006: fmt err (place.cpp:77)",
                 "[2006-2006-0/E-0/E/place.cpp:77/]");
  zx_pos = {"a_long_name_of_a_file.cpp", 1234};
  EXPECT_FAILURE(sfmt("%y"), "2006: fmt err (~long_name_of_a_file:1234)",
                 "[2006-2006-0/E-0/E/~long_name_o/]");
  zx_pos = {};
  EXPECT_FAILURE(sfmt("%y"), "2006: fmt err (?:0)", "[2006-2006-0/E-0/E/?:0/]");
}

TEST(zxsfmt, the_position_is_the_one_that_was_stored_last) {
  const int line = __LINE__ + 1;
  ZX_HERE;
  const std::string place = "zxsfmt_test.cpp:" + std::to_string(line);
  EXPECT_FAILURE(sfmt("#"), "2006: fmt err (" + place + ")",
                 "[2006-2006-0/E-0/E/zxsfmt_test./]");
}

TEST(zxsfmt, behind_a_dropped_failure_there_is_the_text_so_far) {
  kit::with_failures_dropped([] {
    EXPECT_EQ(text_of(sfmt("a#b#c", 1)), "a1b#c");
    EXPECT_EQ(text_of(sfmt("ab", 1)), "ab");
  });
}

TEST(zxsfmt, fifteen_arguments_are_taken) {
  static_assert(zxsfmt_detail::k_max_args == 15);
  EXPECT_EQ(text_of(sfmt("###############", 1)), "#######1");
  EXPECT_EQ(text_of(sfmt("#,#,#,#,#,#,#,#,#,#,#,#,#,#,#", 1, "two", 3.5, '4',
                         zxStr("5"), 6, 7, 8, 9, 10, 11, 12, 13, 14, zxDate())),
            "1,two,3.5,4,5,6,7,8,9,10,11,12,13,14,01-01-70");
}

// ---- the entries that write

// A file to write to.
class Output {
 public:
  Output() { file.create(path.c_str()); }

  // What was written until now.
  std::string written() {
    EXPECT_TRUE(file.handle->flush());
    return read_file(path);
  }

 private:
  TempDir folder;
  const std::string path = folder.file("out");

 public:
  zxBFile file;
};

// A standard stream that goes to a file until the end of the block.
class Redirected {
 public:
  Redirected(zxBFile& standard_file, Output& output)
      : standard(standard_file), other(output.file) {
    std::swap(standard.handle, other.handle);
  }
  Redirected(const Redirected&) = delete;
  Redirected& operator=(const Redirected&) = delete;
  ~Redirected() { std::swap(standard.handle, other.handle); }

 private:
  zxBFile& standard;
  zxBFile& other;
};

TEST(zxsfmt, fprint_writes_the_text_and_counts_a_line) {
  Output output;
  fprint(output.file, "a #\n", zxStr("b\0\n", 3));
  fprint(output.file, "");
  fprint(output.file, "#", 'c');
  EXPECT_EQ(output.written(), "a b\0\n\r\nc"s);
  EXPECT_EQ(output.file.lines, 3);
}

TEST(zxsfmt, oprint_and_eprint_write_to_their_streams) {
  Output out;
  Output err;
  {
    const Redirected to_out(g_stdout, out);
    const Redirected to_err(g_stderr, err);
    oprint("o#\n", 1);
    eprint("e#\n", 2);
    oprint("o");
  }
  EXPECT_EQ(out.written(), "o1\r\no");
  EXPECT_EQ(err.written(), "e2\r\n");
}

TEST(zxsfmt, a_bad_format_is_fatal_without_a_position_and_writes_nothing) {
  Output output;
  constexpr char k_message[] = "2006: fmt err ()";
  constexpr char k_line[] = "[2006-2006-0/E-0/E//]";
  EXPECT_FAILURE(fprint(output.file, "abc#"), k_message, k_line);
  {
    const Redirected to_out(g_stdout, output);
    EXPECT_FAILURE(oprint("abc", 1), k_message, k_line);
  }
  {
    const Redirected to_err(g_stderr, output);
    EXPECT_FAILURE(eprint("abc%y"), k_message, k_line);
  }
  kit::with_failures_dropped([&] { fprint(output.file, "abc#"); });
  EXPECT_EQ(output.written(), "");
  EXPECT_EQ(output.file.lines, 0);
}

TEST(zxsfmt, writing_to_a_closed_file_is_fatal) {
  zxBFile closed;
  EXPECT_FAILURE(fprint(closed, "abc"), "1024: puts: file not opened",
                 "[1024-1024-0/E-0/E//]");
  kit::with_failures_dropped([&] { fprint(closed, "abc"); });
  EXPECT_FALSE(closed.is_open());
}

ZX_CASE(zxsfmt_prints) {
  init_zxlib_args(argc, argv);
  oprint("one\n");
  eprint("# \n", "two");
  oprint("#\n", zxStr("\r\n\x1A\0\xE0", 5));
  return 0;
}

TEST(zxsfmt, a_program_prints_bytes_as_they_are) {
  const kit::ProcessResult result = kit::run_case("zxsfmt_prints");
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "one\r\n\r\n\x1A\0\xE0\r\n"s);
  EXPECT_EQ(result.err, "two \r\n");
}

// ---- the entry that fails

TEST(zxsfmt, bailf_ends_with_its_text) {
  EXPECT_FAILURE(bailf("no such # (#)", "thing", 5), "no such thing (5)",
                 "[0-0-0/E-0/E/no such thin/]");
  EXPECT_FAILURE(bailf("a\n"), "a\r\n", "[0-0-0/E-0/E/a\r\n/]");
  EXPECT_FAILURE(bailf("#", "%s%n#$"), "%s%n#$", "[0-0-0/E-0/E/%s%n#$/]");
  EXPECT_FAILURE(bailf(""), "", "[0-0-0/E-0/E//]");
}

TEST(zxsfmt, the_text_of_bailf_is_cut_to_140_bytes) {
  const std::string text(200, 't');
  EXPECT_FAILURE(bailf("#", text.c_str()), text.substr(0, 140),
                 "[0-0-0/E-0/E/tttttttttttt/]");
}

TEST(zxsfmt, a_bad_format_of_bailf_is_2006) {
  EXPECT_FAILURE(bailf("abc#"), "2006: fmt err ()", "[2006-2006-0/E-0/E//]");
  EXPECT_FAILURE(bailf("abc", 1), "2006: fmt err ()", "[2006-2006-0/E-0/E//]");
}

TEST(zxsfmt, bailf_takes_sixteen_arguments) {
  EXPECT_FAILURE(
      bailf("################,################,#,#,#,#,#,#,#,#,#,#,#,#,#,#,#,"
            "#",
            1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16),
      "########,########,1,2,3,4,5,6,7,8,9,10,11,12,13,14,15,16",
      "[0-0-0/E-0/E/########,###/]");
}

}  // namespace
