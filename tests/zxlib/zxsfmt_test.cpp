// zxsfmt_test.cpp - the format language: which types are arguments, plain
// text, default forms, bad formats, the entries.  More of it is in
//   zxsfmt_directives_test.cpp  the "%" directives, limits and aliases
//   zxsfmt_table_test.cpp       each directive by each tag
//   zxsfmt_escapes_test.cpp     the "$" escapes, environments, lists
//   zxsfmt_number_test.cpp      the text of numbers
//   zxsfmt_picture_test.cpp     pictures of numbers
//   zxsfmt_model_test.cpp       random formats against a second interpreter
//   zxsfmt_page_test.cpp        the examples of the page
// Tests zxlib/zxsfmt.h and zxsfmt*.cpp.
#include "zxsfmt.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "format_run.h"
#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "zxmainf.h"
#include "zxplat.h"

namespace {

using format_run::bad;
using format_run::compose;
using format_run::Composed;
using format_run::good;
using kit::read_file;
using kit::TempDir;
using kit::text_of;
using namespace std::string_literals;

// ---- which types have a form

enum Plain { k_plain = 3 };
enum class Scoped { one };
struct Other {};
struct ToString {
  operator zxStr() const { return zxStr(); }
};
struct ToInt {
  operator int() const { return 1; }
};
enum Small : unsigned char { k_small = 7 };
struct ToDate {
  operator zxDate() const { return zxDate(); }
};

template <class T>
constexpr bool is_argument = std::is_constructible_v<zxFmtArg, T>;

static_assert(is_argument<int>);
static_assert(is_argument<const int&>);
static_assert(is_argument<bool>);
static_assert(is_argument<short>);
static_assert(is_argument<unsigned short>);
static_assert(is_argument<signed char>);
static_assert(is_argument<Plain>);
static_assert(is_argument<unsigned>);
static_assert(is_argument<long>);
static_assert(is_argument<unsigned long>);
static_assert(is_argument<char>);
static_assert(is_argument<unsigned char>);
static_assert(is_argument<double>);
static_assert(is_argument<float>);
static_assert(is_argument<const char*>);
static_assert(is_argument<char*>);
static_assert(is_argument<const char (&)[4]>);
static_assert(is_argument<const zxStr&>);
static_assert(is_argument<const zxIStr&>);
static_assert(is_argument<const zxDate&>);
static_assert(is_argument<const zxTime&>);
static_assert(is_argument<const zxQVA<zxStr>&>);
static_assert(is_argument<const zxSA<zxStr>&>);
static_assert(is_argument<std::time_t*>);
static_assert(is_argument<const std::time_t*>);
static_assert(is_argument<void*>);
static_assert(is_argument<const int*>);
static_assert(is_argument<Other*>);

static_assert(!is_argument<long long>);
static_assert(!is_argument<unsigned long long>);
static_assert(!is_argument<long double>);
static_assert(!is_argument<wchar_t>);
static_assert(!is_argument<char8_t>);
static_assert(!is_argument<char16_t>);
static_assert(!is_argument<char32_t>);
static_assert(!is_argument<std::nullptr_t>);
static_assert(!is_argument<Scoped>);
static_assert(!is_argument<Other>);
static_assert(!is_argument<ToString>);
static_assert(!is_argument<ToInt>);
static_assert(!is_argument<std::vector<bool>::reference>);
static_assert(!is_argument<ToDate>);
static_assert(!is_argument<std::string>);
static_assert(!is_argument<std::string_view>);
static_assert(!is_argument<const zxQVA<int>&>);
static_assert(!is_argument<const zxSA<int>&>);
static_assert(!is_argument<const zxAA<int, zxStr>&>);
static_assert(!is_argument<volatile void*>);
static_assert(!is_argument<void (*)()>);
static_assert(!is_argument<int Other::*>);

static_assert(zxFmtArg(1).tag == 'i');
static_assert(zxFmtArg(1U).tag == 'u');
static_assert(zxFmtArg('1').tag == 'c');
static_assert(zxFmtArg(static_cast<unsigned char>(1)).tag == 'b');
static_assert(zxFmtArg(1.0).tag == 'f');
static_assert(zxFmtArg("1").tag == 'z');
static_assert(zxFmtArg(true).tag == 'i');
static_assert(zxFmtArg(static_cast<short>(-1)).tag == 'i');
static_assert(zxFmtArg(static_cast<signed char>(-1)).number == -1);
static_assert(zxFmtArg(k_plain).number == 3);
static_assert(zxFmtArg(k_small).tag == 'i' && zxFmtArg(k_small).number == 7);
static_assert(zxFmtArg(1.5F).real == 1.5);
static_assert(zxFmtArg('\xFF').number == -1);
static_assert(zxFmtArg(static_cast<unsigned char>(255)).word() == 255);
static_assert(zxFmtArg(77, nullptr).tag == 77);

TEST(zxsfmt, each_type_has_its_tag) {
  const std::time_t moment = 5;
  const zxIStr inner("text");
  int number = 1;
  unsigned char byte = 1;
  zxQVA<zxStr> texts;
  zxSA<zxStr> table;
  EXPECT_EQ(zxFmtArg(1L).tag, 'l' + 0U);
  EXPECT_EQ(zxFmtArg(1UL).tag, 'v' + 0U);
  EXPECT_EQ(zxFmtArg(zxStr()).tag, 's' + 0U);
  EXPECT_EQ(zxFmtArg(inner).tag, 's' + 0U);
  EXPECT_EQ(zxFmtArg(zxDate()).tag, 't' + 0U);
  EXPECT_EQ(zxFmtArg(zxTime()).tag, 'M' + 0U);
  EXPECT_EQ(zxFmtArg(&moment).tag, 'm' + 0U);
  EXPECT_EQ(zxFmtArg(texts).tag, 'k' + 0U);
  EXPECT_EQ(zxFmtArg(table).tag, zxFmtArg::k_table);
  EXPECT_EQ(zxFmtArg(&number).tag, 'p' + 0U);
  EXPECT_EQ(zxFmtArg(&byte).tag, 'p' + 0U);
  EXPECT_EQ(zxFmtArg(&texts).tag, 'p' + 0U);
}

TEST(zxsfmt, a_long_beyond_32_bits_fails_an_assertion) {
  EXPECT_EQ(zxFmtArg(2147483647L).number, INT32_MAX);
  EXPECT_EQ(zxFmtArg(-2147483647L - 1).number, INT32_MIN);
  EXPECT_EQ(zxFmtArg(4294967295UL).word(), UINT32_MAX);
  if (sizeof(long) == 4) GTEST_SKIP() << "a long has 32 bits here";
  const auto above = static_cast<long>(std::int64_t{1} << 31);
  for (const long number : {LONG_MAX, LONG_MIN, above, ~above})
    EXPECT_ASSERTION(sfmt("#", number), "zxsfmt");
  EXPECT_ASSERTION(sfmt("#", ULONG_MAX), "zxsfmt");
  EXPECT_ASSERTION(
      sfmt("#", static_cast<unsigned long>(std::uint64_t{1} << 32)), "zxsfmt");
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

TEST(zxsfmt, words_and_bytes_have_their_form) {
  EXPECT_EQ(compose("# #", 0U, 4294967295U), good("0 4294967295"));
  EXPECT_EQ(compose("# #", -5L, 4294967295UL), good("-5 4294967295"));
  EXPECT_EQ(
      compose("# # #", static_cast<unsigned char>(200),
              static_cast<unsigned char>(0), static_cast<unsigned char>(15)),
      good("\\xc8 \\x0 \\xf"));
  EXPECT_EQ(compose("# #", true, static_cast<signed char>(-3)), good("1 -3"));
}

TEST(zxsfmt, a_second_form_of_a_string_has_a_placeholder_only) {
  const zxStr text("a\0b", 3);
  const zxFmtArg record(zxFmtArg::k_text, &text);
  EXPECT_EQ(compose("<#>", record), good("<a\0b>"s));
  EXPECT_EQ(compose("<%s>", record), bad("<%s>"));
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

TEST(zxsfmt, a_failing_directive_leaves_its_text_and_what_follows) {
  const zxStr text = "x";
  EXPECT_EQ(compose("a#b%sc\n#%%", 1, 2, 3), bad("a1b%sc\n#%%"));
  EXPECT_EQ(compose("a%d b\n", text), bad("a%d b\n"));
  EXPECT_EQ(compose("a%f b\n", 1), bad("a%f b\n"));
  EXPECT_EQ(compose("a%-5.2[x]lq b", 1), bad("a%-5.2[x]lq b"));
}

TEST(zxsfmt, the_old_text_is_dropped_first) {
  zxStr out = "old";
  EXPECT_FALSE(sfmt_try(out, "%d", "x"));
  EXPECT_EQ(text_of(out), "%d");
  EXPECT_TRUE(sfmt_try(out, ""));
  EXPECT_EQ(text_of(out), "");
}

// Composing does not take room away that a string has.
TEST(zxsfmt, room_in_the_text_stays) {
  zxStr out;
  out.reserve(10'000);
  EXPECT_TRUE(sfmt_try(out, "#", 1));
  EXPECT_EQ(out.capacity(), 10'000);
}

// ---- the entries that give a text

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

TEST(zxsfmt, sfmt_to_writes_into_a_string) {
  zxStr out = "old";
  EXPECT_EQ(&sfmt_to(out, "a#\n", 5), &out);
  EXPECT_EQ(text_of(out), "a5\r\n");
  zxIStr inner;
  sfmt_to(inner, "%3d", 7);
  EXPECT_EQ(text_of(inner), "  7");
  zx_pos = {"place.cpp", 78};
  EXPECT_FAILURE(sfmt_to(out, "b#"), "2006: fmt err (place.cpp:78)",
                 "[2006-2006-0/E-0/E/place.cpp:78/]");
  kit::with_failures_dropped([&] { sfmt_to(out, "b#"); });
  EXPECT_EQ(text_of(out), "b#");
}

TEST(zxsfmt, sfmt_try_tells_whether_the_format_is_good) {
  zxStr out;
  EXPECT_TRUE(sfmt_try(out, "a#", 5));
  EXPECT_EQ(text_of(out), "a5");
  EXPECT_FALSE(sfmt_try(out, "b#%s#\n", 5, 6));
  EXPECT_EQ(text_of(out), "b5%s#\n");
  EXPECT_FALSE(sfmt_try(out, "c\n", 5));
  EXPECT_EQ(text_of(out), "c\r\n");
}

TEST(zxsfmt, sfmt_try_s_takes_a_string) {
  zxStr out;
  EXPECT_TRUE(sfmt_try_s(out, zxStr("a#"), 5));
  EXPECT_EQ(text_of(out), "a5");
  EXPECT_FALSE(sfmt_try_s(out, zxStr("b#")));
  EXPECT_EQ(text_of(out), "b#");
  EXPECT_TRUE(sfmt_try_s(out, zxStr("c\0#", 3)));
  EXPECT_EQ(text_of(out), "c");
  EXPECT_TRUE(sfmt_try_s(out, zxStr()));
  EXPECT_EQ(text_of(out), "");
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

// ---- the entry for the debugger

std::string debugged;

// What is handed to the debugger.
class Debugger {
 public:
  Debugger() {
    debugged.clear();
    zxplat::process.debug_output = [](const char* text) {
      debugged += text;
      debugged += '|';
    };
  }
  Debugger(const Debugger&) = delete;
  Debugger& operator=(const Debugger&) = delete;
  ~Debugger() {
    zxplat::process.debug_output = zxplat::system_process.debug_output;
  }
};

TEST(zxsfmt, dprint_hands_its_text_to_the_debugger) {
  const Debugger debugger;
  dprint("a#\n", 5);
  dprint("");
  EXPECT_EQ(debugged, "a5\r\n||");
}

TEST(zxsfmt, a_bad_format_of_dprint_is_2006) {
  const Debugger debugger;
  EXPECT_FAILURE(dprint("a#"), "2006: fmt err ()", "[2006-2006-0/E-0/E//]");
  kit::with_failures_dropped([] { dprint("a", 1); });
  EXPECT_EQ(debugged, "");
}

ZX_CASE(zxsfmt_prints_in_the_debugger) {
  init_zxlib_args(argc, argv);
  dprint("one\n");
  dprint("%05d", 42);
  return 0;
}

TEST(zxsfmt, what_goes_to_the_debugger_goes_to_a_file_that_is_asked_for) {
  const TempDir folder;
  kit::ProcessOptions options;
  options.variables = {{"ZX_DEBUG_OUT", folder.file("debug")}};
  const kit::ProcessResult result =
      kit::run_case("zxsfmt_prints_in_the_debugger", {}, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out + result.err, "");
  EXPECT_EQ(read_file(folder.file("debug")), "one\r\n00042");
  options.variables = {{"ZX_DEBUG_OUT", "-"}};
  EXPECT_EQ(kit::run_case("zxsfmt_prints_in_the_debugger", {}, options).err,
            "one\r\n00042");
}

// ---- the entries that fail

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

TEST(zxsfmt, bailfn_ends_with_a_message_and_its_text) {
  EXPECT_FAILURE(bailfn(1004, "no#such", 1),
                 "1004: create: Can't open file 'no1such' for writing",
                 "[1004-1004-0/E-0/E/no1such/]");
  EXPECT_FAILURE(bailfn(1004, "%s%%n", "%s"),
                 "1004: create: Can't open file '%s%n' for writing",
                 "[1004-1004-0/E-0/E/%s%n/]");
  EXPECT_FAILURE(bailfn(7, "a\n"), "7: a\r\n", "[7-7-0/E-0/E/a\r\n/]");
  EXPECT_FAILURE(bailfn(0, "a#", 'b'), "ab", "[0-0-0/E-0/E/ab/]");
}

TEST(zxsfmt, a_bad_format_of_bailfn_is_2006) {
  EXPECT_FAILURE(bailfn(1004, "a#"), "2006: fmt err ()",
                 "[2006-2006-0/E-0/E//]");
  EXPECT_FAILURE(bailfn(1004, "a", 1), "2006: fmt err ()",
                 "[2006-2006-0/E-0/E//]");
}

TEST(zxsfmt, entries_come_back_from_a_dropped_failure) {
  kit::with_failures_dropped([] {
    bailf("a#");
    bailf("a#", 1);
    bailfn(1004, "a#");
    bailfn(1004, "a#", 1);
  });
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
