// zxsfmt_directives_test.cpp - the "%" directives: padding, pictures, forms of
// moments, what limits them, and arguments that lie in the text.
// Tests zxlib/zxsfmt.h and zxsfmt*.cpp.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <ctime>
#include <limits>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "format_run.h"
#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/text.h"
#include "zones.h"
#include "zxmainf.h"
#include "zxsfmt.h"

namespace {

using format_run::bad;
using format_run::compose;
using format_run::good;
using format_run::InZone;
using kit::text_of;
using namespace std::string_literals;

struct Row {
  const char* format;
  zxFmtArg argument;
  const char* text;
};

void expect_good(const std::vector<Row>& rows) {
  for (const Row& row : rows)
    EXPECT_EQ(compose(row.format, row.argument), good(row.text)) << row.format;
}

std::string blanks(std::size_t count) { return std::string(count, ' '); }

// ---- whole numbers and characters

TEST(zxsfmt_directives, whole_numbers_have_flags_a_width_and_a_precision) {
  expect_good({
      {"%5d|", 42, "   42|"},
      {"%-5d|", 42, "42   |"},
      {"%05d", 42, "00042"},
      {"%05d", -42, "-0042"},
      {"%-05d|", 42, "42   |"},
      {"%+d", 42, "+42"},
      {"%+d", -42, "-42"},
      {"% d", 42, " 42"},
      {"%+ d", 42, "+42"},
      {"%.4d", -42, "-0042"},
      {"%6.4d", 42, "  0042"},
      {"%06.4d", 42, "  0042"},
      {"%.0d", 0, ""},
      {"%3.0d", 0, "   "},
      {"%+.0d", 0, "+"},
      {"%.d", 0, ""},
      {"%.d", 5, "5"},
      {"%2d", 12345, "12345"},
      {"%#x", 255, "0xff"},
      {"%#X", 255, "0XFF"},
      {"%#x", 0, "0"},
      {"%#o", 8, "010"},
      {"%#.0o", 0, "0"},
      {"%08x", 255, "000000ff"},
      {"%#08x", 255, "0x0000ff"},
      {"%#8x", 255, "    0xff"},
      {"%-#8x|", 255, "0xff    |"},
      {"%.8X", 0xABC, "00000ABC"},
      {"%d", INT32_MIN, "-2147483648"},
      {"%u", INT32_MIN, "2147483648"},
      {"%o", 4294967295U, "37777777777"},
  });
}

TEST(zxsfmt_directives, a_number_has_32_bits_with_an_l_and_without) {
  expect_good({
      {"%ld", -1L, "-1"},
      {"%lx", -1L, "ffffffff"},
      {"%lu", -1, "4294967295"},
      {"%lX", 255UL, "FF"},
      {"%li", 4294967295U, "-1"},
      {"%lc", 65, "A"},
      {"%ls", "abc", "abc"},
      {"%lf", 0.5, "0.500000"},
  });
}

TEST(zxsfmt_directives, a_character_stands_in_its_width) {
  expect_good({
      {"%c", 65, "A"},
      {"%c", 65 + 256, "A"},
      {"%3c|", 'x', "  x|"},
      {"%-3c|", 'x', "x  |"},
      {"%.0c", 'x', "x"},
      {"%c", '%', "%"},
      {"%c", '\n', "\n"},
  });
}

TEST(zxsfmt_directives, a_nul_character_ends_its_text) {
  expect_good({
      {"<%c>", 0, "<>"},
      {"<%c>", '\0', "<>"},
      {"<%3c>", 0, "<  >"},
      {"<%-3c>", 0, "<>"},
      {"<%1c>", 256, "<>"},
  });
  EXPECT_EQ(compose("<#>", '\0'), good("<\0>"s));
}

TEST(zxsfmt_directives, a_pointer_has_all_its_digits) {
  const auto* address = reinterpret_cast<const void*>(std::uintptr_t{0xABCDEF});
  const std::string text = std::string(2 * sizeof(void*) - 6, '0') + "ABCDEF";
  EXPECT_EQ(compose("%p", address), good(text));
  EXPECT_EQ(compose("#", address), good(text));
  EXPECT_EQ(compose("%lp", address), good(text));
  EXPECT_EQ(compose("<%20p>", address),
            good("<" + blanks(20 - text.size()) + text + ">"));
  EXPECT_EQ(compose("<%-20p>", address),
            good("<" + text + blanks(20 - text.size()) + ">"));
  const void* null = nullptr;
  EXPECT_EQ(compose("%p", null), good(std::string(2 * sizeof(void*), '0')));
}

// ---- padded texts

TEST(zxsfmt_directives, a_text_is_cut_and_padded) {
  expect_good({
      {"%10.3s", "abcdef", "       abc"},
      {"%#.3s", "abcdef", "def"},
      {"%-5s|", "ab", "ab   |"},
      {"%5s|", "ab", "   ab|"},
      {"%2s", "abc", "abc"},
      {"%.3s", "ab", "ab"},
      {"%.0s|", "abc", "|"},
      {"%3.0s|", "abc", "   |"},
      {"%#-5.2s|", "abcdef", "ef   |"},
      {"%#5.2s|", "abcdef", "   ef|"},
      {"%-5.2s|", "abcdef", "ab   |"},
      {"%05s", "ab", "   ab"},
      {"%5z|", "ab", "   ab|"},
      {"%5h|", "ab", "   ba|"},
      {"%.2h", "abc", "cb"},
      {"%#.2h", "abc", "ba"},
      {"%h", "", ""},
  });
  EXPECT_EQ(compose("%5s|%h", zxStr("a\0b", 3), zxStr("c\0d", 3)),
            good("  a\0b|d\0c"s));
}

TEST(zxsfmt_directives, flags_in_another_order_hide_width_and_precision) {
  for (const char* flags :
       {"-#", "+", " ", "##", "--", "#-#", "#+", "-+", "+-", "# -", "#--"}) {
    const std::string format = "%" + std::string(flags) + "10.2s";
    EXPECT_EQ(compose(format.c_str(), "abc"), good("abc")) << flags;
  }
}

TEST(zxsfmt_directives, a_padded_text_has_any_length) {
  const std::string large(100'000, 'x');
  EXPECT_EQ(compose("%s", large.c_str()), good(large));
  EXPECT_EQ(compose("%h", zxStr(large.c_str())), good(large));
  EXPECT_EQ(compose("%100002s", large.c_str()), good("  " + large));
  EXPECT_EQ(compose("%3000s", ""), good(blanks(3000)));
  EXPECT_EQ(compose("%-3000.1s", "ab"), good("a" + blanks(2999)));
}

TEST(zxsfmt_directives, an_array_is_joined) {
  zxQVA<zxStr> texts;
  EXPECT_EQ(compose("#%L%.1L", texts, texts, texts), good(""));
  texts.append("a");
  EXPECT_EQ(compose("#%L%.1L", texts, texts, texts), good("aaa"));
  texts.append("");
  texts.append("bc\n");
  EXPECT_EQ(compose("#", texts), good("a  bc\n"));
  EXPECT_EQ(compose("%L", texts), good("a  bc\n"));
  EXPECT_EQ(compose("%.1L", texts), good("a\r\n\r\nbc\n"));
  EXPECT_EQ(compose("%.2L", texts), good("a  bc\n"));
  EXPECT_EQ(compose("%.0L", texts), good("a  bc\n"));
  EXPECT_EQ(compose("%8L", texts), good("  a  bc\n"));
  EXPECT_EQ(compose("%10.1L", texts), good("  a\r\n\r\nbc\n"));
  EXPECT_EQ(compose("%-8L|", texts), good("a  bc\n  |"));
  // Two digits are a precision.
  EXPECT_EQ(compose("%.04L", texts), good("a  b"));
  EXPECT_EQ(compose("%#.03L", texts), good("bc\n"));
}

// ---- a star

TEST(zxsfmt_directives, a_star_takes_its_number_from_an_argument) {
  EXPECT_EQ(compose("%*d|", 5, 42), good("   42|"));
  EXPECT_EQ(compose("%*d|", -5, 42), good("42   |"));
  EXPECT_EQ(compose("%-*d|", 5, 42), good("42   |"));
  EXPECT_EQ(compose("%*.*f", 8, 2, 3.14159), good("    3.14"));
  EXPECT_EQ(compose("%.*s", 2, "abc"), good("ab"));
  EXPECT_EQ(compose("%*s", 5, "abc"), good("  abc"));
  EXPECT_EQ(compose("%*s|", -5, "abc"), good("abc  |"));
  EXPECT_EQ(compose("%#*.*s|", -5, 2, "abc"), good("bc   |"));
  EXPECT_EQ(compose("%*[,]v", 9, 1234567), good("1,234,567"));
  EXPECT_EQ(compose("%.*T", 1, static_cast<const std::time_t*>(nullptr)).text,
            compose("$d").text);
}

TEST(zxsfmt_directives, a_star_without_an_int_adds_nothing) {
  EXPECT_EQ(compose("a%*d b\n#", 1L, 42), bad("a"));
  EXPECT_EQ(compose("a%*d b", 1U, 42), bad("a"));
  EXPECT_EQ(compose("a%*d b", '1', 42), bad("a"));
  EXPECT_EQ(compose("a%*d b", "1", 42), bad("a"));
  EXPECT_EQ(compose("a%*d b", 1.0, 42), bad("a"));
  EXPECT_EQ(compose("a%.*d b", zxStr("1"), 42), bad("a"));
  EXPECT_EQ(compose("a%*d b"), bad("a"));
  EXPECT_EQ(compose("a%5.*d b"), bad("a"));
  EXPECT_EQ(compose("a%*.*d b", 5), bad("a"));
  EXPECT_EQ(compose("a%*d b", 5), bad("a%*d b"));
}

// ---- the word that blanks

TEST(zxsfmt_directives, err_and_void_replace_what_was_composed) {
  EXPECT_EQ(compose("a %s b", "err"), good("err b"));
  EXPECT_EQ(compose("a %s b", "void"), good("void b"));
  EXPECT_EQ(compose("# %5.1s\n", 1, "err"), good("err\r\n"));
  EXPECT_EQ(compose("a%sb%sc", "err", "void"), good("voidc"));
  EXPECT_EQ(compose("%s%s", "err", "x"), good("errx"));
  EXPECT_EQ(compose("a%d#", "err", 1), good("err1"));
  EXPECT_EQ(compose("a%d", "err", 1), bad("err"));
}

TEST(zxsfmt_directives, only_the_exact_plain_text_blanks) {
  EXPECT_EQ(compose("a%s", "[err]"), good("a[err]"));
  EXPECT_EQ(compose("a%s", "Err"), good("aErr"));
  EXPECT_EQ(compose("a%s", "errs"), good("aerrs"));
  EXPECT_EQ(compose("a%s", "er"), good("aer"));
  EXPECT_EQ(compose("a%s", " void"), good("a void"));
  EXPECT_EQ(compose("a%s", zxStr("err")), good("aerr"));
  EXPECT_EQ(compose("a#", "err"), good("aerr"));
  EXPECT_EQ(compose("a%*d", "err", 1), bad("a"));
  EXPECT_EQ(compose("a%<", "err"), good("a"));
}

// ---- limits of a directive's text

TEST(zxsfmt_directives, a_directive_has_31_bytes) {
  const std::string zeros(28, '0');
  EXPECT_EQ(compose(("%" + zeros + "1d").c_str(), 7), good("7"));
  EXPECT_EQ(compose(("a%" + zeros + "01d").c_str(), 7),
            bad("a%" + zeros + "01d"));
  const std::string signs(29, '+');
  EXPECT_EQ(compose(("%" + signs + "d").c_str(), 7), good("+7"));
  EXPECT_EQ(compose(("%" + signs + "+d").c_str(), 7), bad("%" + signs + "+d"));
  EXPECT_EQ(compose(("%" + signs + "s").c_str(), "x"), good("x"));
  EXPECT_EQ(compose(("%" + signs + "+s").c_str(), "x"),
            bad("%" + signs + "+s"));
  const std::string precision = "." + zeros;
  EXPECT_EQ(compose(("%" + precision + "d").c_str(), 7), good("7"));
  EXPECT_EQ(compose(("%" + precision + "0d").c_str(), 7),
            bad("%" + precision + "0d"));
  // The number of a star counts with its digits.
  const std::string many(27, '+');
  EXPECT_EQ(compose(("%" + many + "*d").c_str(), 12, 7),
            good(blanks(10) + "+7"));
  EXPECT_EQ(compose(("%" + many + "*d").c_str(), 100, 7),
            bad("%" + many + "*d"));
  const std::string endless(1000, '5');
  EXPECT_EQ(compose(("%" + endless + "d").c_str(), 7),
            bad("%" + endless + "d"));
  EXPECT_EQ(compose(("%" + endless).c_str(), 7), bad("%" + endless));
}

TEST(zxsfmt_directives, a_bracket_has_19_bytes_and_is_closed) {
  const std::string commas(19, ',');
  EXPECT_EQ(compose(("%[" + commas + "]v").c_str(), 1234), good("1,234"));
  EXPECT_EQ(compose(("a%[" + commas + ",]v").c_str(), 1234),
            bad("a%[" + commas + ",]v"));
  EXPECT_EQ(compose(("a%[" + commas + ",]T").c_str(),
                    static_cast<const std::time_t*>(nullptr)),
            bad("a%[" + commas + ",]T"));
  const zxDate date;
  for (const char* format :
       {"a%[", "a%[,", "a%[,v\n", "a%5.2[%Y", "a%[]", "a%[]l", "a%[[[["})
    EXPECT_EQ(compose(format, date), bad(format)) << format;
  const std::string endless = "%[" + std::string(1000, 'k') + "]v";
  EXPECT_EQ(compose(endless.c_str(), 1), bad(endless));
}

TEST(zxsfmt_directives, a_format_that_ends_in_a_directive_is_bad) {
  for (const char* format : {"a%", "a%5", "a%-", "a%.", "a%5.2", "a%l", "a%#",
                             "a% ", "a%[]", "a%[x]l"}) {
    EXPECT_EQ(compose(format), bad(format)) << format;
    EXPECT_EQ(compose(format, 1), bad(format)) << format;
  }
}

// ---- limits of a directive's output

TEST(zxsfmt_directives, a_number_has_255_bytes) {
  const double real = 1.5;
  const std::time_t* now = nullptr;
  const zxDate date;
  const void* address = nullptr;
  EXPECT_EQ(compose("%255d", 1), good(blanks(254) + "1"));
  EXPECT_EQ(compose("%-255d", 1), good("1" + blanks(254)));
  EXPECT_EQ(compose("%.255d", 1), good(std::string(254, '0') + "1"));
  EXPECT_EQ(compose("%255c", 'x'), good(blanks(254) + "x"));
  EXPECT_EQ(compose("%255.1f", real), good(blanks(252) + "1.5"));
  EXPECT_EQ(compose("%.253f", real), good("1.5" + std::string(252, '0')));
  EXPECT_EQ(compose("%255T", now).text.size(), 255U);
  EXPECT_EQ(compose("%255t", date).text.size(), 255U);
  EXPECT_EQ(compose("%255p", address).text.size(), 255U);
  EXPECT_SFMT_ASSERTION(compose("%256d", 1));
  EXPECT_SFMT_ASSERTION(compose("%-256d", 1));
  EXPECT_SFMT_ASSERTION(compose("%.256d", 1));
  EXPECT_SFMT_ASSERTION(compose("%+.255d", 1));
  EXPECT_SFMT_ASSERTION(compose("%256c", 'x'));
  EXPECT_SFMT_ASSERTION(compose("%256.1f", real));
  EXPECT_SFMT_ASSERTION(compose("%.254f", real));
  EXPECT_SFMT_ASSERTION(compose("%.254e", real));
  EXPECT_SFMT_ASSERTION(compose("%f", 1e300));
  EXPECT_SFMT_ASSERTION(compose("%256T", now));
  EXPECT_SFMT_ASSERTION(compose("%256t", date));
  EXPECT_SFMT_ASSERTION(compose("%256p", address));
  EXPECT_SFMT_ASSERTION(compose("%*d", 256, 1));
  EXPECT_SFMT_ASSERTION(compose("%*d", -256, 1));
}

TEST(zxsfmt_directives, widths_and_precisions_without_end_do_no_harm) {
  for (const char* digits : {"2147483647", "2147483648", "4294967295",
                             "4294967297", "99999999999999999999"}) {
    const std::string width = "%"s + digits;
    const std::string precision = "%."s + digits;
    EXPECT_SFMT_ASSERTION(compose((width + "d").c_str(), 1));
    EXPECT_SFMT_ASSERTION(compose((precision + "d").c_str(), 1));
    EXPECT_SFMT_ASSERTION(compose((width + "f").c_str(), 1.5));
    EXPECT_SFMT_ASSERTION(compose((precision + "f").c_str(), 1.5));
    EXPECT_SFMT_ASSERTION(compose((precision + "e").c_str(), 1.5));
    EXPECT_SFMT_ASSERTION(compose((width + "c").c_str(), 1));
    EXPECT_SFMT_ASSERTION(compose((width + "t").c_str(), zxDate()));
    EXPECT_SFMT_ASSERTION(compose((width + "v").c_str(), 1));
    EXPECT_EQ(compose((precision + "s").c_str(), "abc"), good("abc"));
    EXPECT_EQ(compose((precision + "c").c_str(), 'x'), good("x"));
    EXPECT_EQ(compose((precision + "g").c_str(), 1.5), good("1.5"));
  }
}

// ---- dates and times

constexpr std::time_t k_winter = 1'236'434'706;  // 2009-03-07 14:05:06 UTC
constexpr std::time_t k_summer = 1'246'449'600;  // 2009-07-01 12:00:00 UTC

TEST(zxsfmt_directives, a_moment_has_six_forms) {
  const InZone zone("UTC0");
  zxTime time;
  time.set_time_t(k_winter);
  const char* forms[] = {"07-03-09 14:05:06", "07-03-09",       "14:05:06",
                         "09/03/07 14:05:06", "07-03-09 14:05", "Mar-07 14:05"};
  for (int i = 0; i < 6; ++i) {
    const std::string format = "%." + std::to_string(i) + "T";
    EXPECT_EQ(compose(format.c_str(), &k_winter), good(forms[i])) << i;
    EXPECT_EQ(compose(format.c_str(), time), good(forms[i])) << i;
  }
  expect_good({{"%T", &k_winter, forms[0]},
               {"%lT", &k_winter, forms[0]},
               {"%10.2T|", &k_winter, "  14:05:06|"},
               {"%-10.2T|", &k_winter, "14:05:06  |"},
               {"%-20T|", &k_winter, "07-03-09 14:05:06   |"},
               {"%.2[%Y]T", &k_winter, "14:05:06"},
               {"%.12T", &k_winter, "07-03-09 14:"},
               {"%.02T", &k_winter, "07"}});
}

TEST(zxsfmt_directives, there_is_no_seventh_form) {
  for (const char* format : {"%.6T", "%.7T", "%.8T", "%.9T", "%30.6T"})
    EXPECT_SFMT_ASSERTION(compose(format, &k_winter));
}

TEST(zxsfmt_directives, a_null_moment_is_now) {
  const InZone zone("UTC0");
  const format_run::Clock clock(k_summer);
  const std::time_t* now = nullptr;
  EXPECT_EQ(compose("#", now), good("01-07-09 12:00:00"));
  EXPECT_EQ(compose("%T", now), good("01-07-09 12:00:00"));
  EXPECT_EQ(compose("%.1T", now), good("01-07-09"));
  EXPECT_EQ(compose("%[%H:%M]t", now), good("12:00"));
}

TEST(zxsfmt_directives, a_date_is_a_text_to_pad) {
  zxDate date;
  date.set(2009, 2, 25);
  expect_good({{"%t", date, "25-02-09"},
               {"%12t|", date, "    25-02-09|"},
               {"%-12t|", date, "25-02-09    |"},
               {"%.5t", date, "25-02"},
               {"%+#12.2t", date, "          25"},
               {"%lt", date, "25-02-09"}});
}

TEST(zxsfmt_directives, a_template_shows_any_field) {
  const InZone zone("UTC0");
  zxTime time;
  time.set_time_t(k_winter);
  zxDate date;
  date.set(2009, 3, 7);
  expect_good({{"%[%y%m%d-%H%M%S]t", time, "090307-140506"},
               {"%[%y%m%d-%H%M%S]t", &k_winter, "090307-140506"},
               {"%[%y%m%d-%H%M%S]t", date, "090307-000000"},
               {"%[%a %b %j %w %%]t", time, "Sat Mar 066 6 %"},
               {"%10[%Y]t|", time, "      2009|"},
               {"%.2[%Y]t|", time, "20|"},
               {"%4.2[%Y]t|", time, "  20|"},
               {"%[]t|", time, "|"},
               {"%[x]t", time, "x"},
               {"<%3[%Q]t>", time, "<   >"},
               {"<%[%]t>", time, "<>"},
               {"<%[%e]t>", time, "<>"}});
}

TEST(zxsfmt_directives, a_template_has_79_bytes_or_none) {
  zxDate wednesday;
  wednesday.set(2009, 3, 4);
  std::string days;
  for (int i = 0; i < 7; ++i) days += "%A";  // 63 bytes, and twice 8
  EXPECT_EQ(compose(("%[" + days + "%X%X]t").c_str(), wednesday).text.size(),
            79U);
  EXPECT_EQ(compose(("<%[" + days + "%X%Xx]t>").c_str(), wednesday),
            good("<>"));
}

TEST(zxsfmt_directives, a_template_does_not_take_a_number) {
  EXPECT_EQ(compose("a%[%y]t", 9), bad("a%[%y]t"));
  EXPECT_EQ(compose("a%[%y]t", 9.0), bad("a%[%y]t"));
  EXPECT_EQ(compose("a%[%y]t", "x"), bad("a%[%y]t"));
}

TEST(zxsfmt_directives,
     flags_ahead_of_a_picture_or_template_fail_an_assertion) {
  const zxDate date;
  for (const char* format :
       {"%-12[%Y]t", "%+[%Y]t", "%#[]t", "% 5[%Y]t", "%[%Y]lt"})
    EXPECT_SFMT_ASSERTION(compose(format, date));
  for (const char* format :
       {"%-12[]v", "%+[]v", "%#[,]v", "% 5v", "%+v", "%[]lv", "%lv", "%-5v"})
    EXPECT_SFMT_ASSERTION(compose(format, 7));
  EXPECT_SFMT_ASSERTION(compose("%*[]v", -5, 7));
  EXPECT_SFMT_ASSERTION(compose("%.*[]v", -5, 7));
}

TEST(zxsfmt_directives, the_null_time_by_each_directive) {
  const zxTime null;
  EXPECT_EQ(compose("<#>", null), good("<>"));
  EXPECT_EQ(compose("%T", null), good("01-01-00 00:00:00"));
  EXPECT_EQ(compose("%[%d-%m-%y]t", null), good("01-01-00"));
  EXPECT_FAILURE(compose("%t", null), "1801: setdate: bad date",
                 "[1801-1801-0/E-0/E//]");
}

TEST(zxsfmt_directives, a_moment_below_1_is_the_constant_day) {
  for (const std::time_t moment : {std::time_t{0}, std::time_t{-1}}) {
    EXPECT_EQ(compose("#", &moment), good("01-01-00 00:00:00"));
    EXPECT_EQ(compose("%[%d-%m-%y]t", &moment), good("01-01-00"));
  }
}

// In summer a time shows its moment's standard time by "#", and what the
// clocks show by the forms of the moment.
ZX_CASE(zxsfmt_in_summer) {
  init_zxlib_args(argc, argv);
  const format_run::Clock clock(k_summer);
  zxTime time;
  zxDate date;
  time.set_time_t(k_summer);
  date.set(2009, 7, 1);
  oprint("#|%T|%[%d %H]t|", time, time, time);
  oprint("#|%T|%[%d %H]t|%[%d %H]t|", &k_summer, &k_summer, &k_summer, date);
  oprint("$T|$t\n");
  time.set_time_t(k_winter);
  date.set(2009, 1, 1);
  oprint("#|%T|%[%d %H]t|%[%d %H]t\n", time, time, time, date);
  return 0;
}

TEST(zxsfmt_directives, forms_of_a_moment_know_daylight_saving) {
  kit::ProcessOptions options;
  options.variables = {{"TZ", "EST5EDT"}};
  const kit::ProcessResult result =
      kit::run_case("zxsfmt_in_summer", {}, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out,
            "01-07-2009 07:00:00|01-07-09 08:00:00|01 08|"
            "01-07-09 08:00:00|01-07-09 08:00:00|01 08|01 01|"
            "09/07/01 08:00:00|08:00:00\r\n"
            "07-03-2009 09:05:06|07-03-09 09:05:06|07 09|01 00\r\n");
}

TEST(zxsfmt_directives, moments_are_shown_by_the_clock_of_every_zone) {
  const format_run::Clock clock(k_winter);
  for (const Zone& zone : k_zones) {
    SCOPED_TRACE(zone.name);
    const InZone here(zone.name);
    const auto second = (k_winter - zone.behind) % 86'400;
    char text[16];
    std::snprintf(
        text, sizeof text, "%.2d:%.2d:%.2d", static_cast<int>(second / 3600),
        static_cast<int>(second / 60 % 60), static_cast<int>(second % 60));
    zxTime time;
    time.set_time_t(k_winter);
    EXPECT_EQ(compose("%.2T", time), good(text));
    EXPECT_EQ(compose("%.2T", &k_winter), good(text));
    EXPECT_EQ(compose("%[%H:%M:%S]t", time), good(text));
    EXPECT_EQ(compose("$t"), good(text));
  }
}

TEST(zxsfmt_directives, the_first_day_is_a_moment_west_of_greenwich_only) {
  const zxDate first;
  {
    const InZone zone("UTC0");
    EXPECT_EQ(compose("%[%y]t", first), good("00"));
  }
  {
    const InZone zone("IST-2");
    EXPECT_EQ(compose("%[%y]t", first), good("00"));
  }
  {
    const InZone zone("EST5");
    EXPECT_EQ(compose("%[%y]t", first), good("70"));
  }
  EXPECT_EQ(compose("%t", first), good("01-01-70"));
}

TEST(zxsfmt_directives, a_date_outside_of_the_calendar_fails_an_assertion) {
  const zxDate never = zxDate::from_stored(-1);
  EXPECT_ASSERTION(compose("#", never), "zxdate");
  EXPECT_ASSERTION(compose("%t", never), "zxdate");
  EXPECT_ASSERTION(compose("%[%Y]t", never), "zxdate");
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(compose("<#>", never), good("<>")); });
}

// ---- pictures

TEST(zxsfmt_directives, pictures_worked_out_by_hand) {
  expect_good({
      {"%[,]v", 1234567.0, "1,234,567"},
      {"%v", 1234567, "1,234,567"},
      {"%5[]v", 3.14159, "3.141"},
      {"%[m]v", 5000000, "5m"},
      {"%[k]v", 5000, "5k"},
      {"%[mK]v", 5000000, "5b"},
      {"%[kK]v", 5000, "5m"},
      {"%5[]v", 1234567, "1235k"},
      {"%5[~]v", 1234567, "  ~1m"},
      {"%3[]v", 1500, " 2k"},
      {"%5[]v", 123456789012.0, "*****"},
      {"%[b]v", 0, ""},
      {"%4[b]v", 0, "    "},
      {"%[p]v", 0.25, "25.00%"},
      {"%.4[0]v", 1.5, "1.5"},
      {"%.4[i]v", 1.0, "1"},
      {"%.4[i]v", 1.5, "1.5000"},
      {"%.1[f]v", -12.5, "(12.5)"},
      {"%.1[r]v", -12.5, "12.5-"},
      {"%.1[+]v", 12.5, "+12.5"},
      {"%.1[a]v", -12.5, "12.5"},
      {"%[d]v", 99.5, "99.50$"},
  });
}

TEST(zxsfmt_directives, what_is_odd_about_pictures_and_stays) {
  expect_good({
      // whole numbers take the automatic precision
      {"%v", 7, "7.00"},
      {"%v", 3, "3.0000"},
      {"%v", 0, "0"},
      {"%[]v", 101, "101.0"},
      {"%[]v", 501, "501"},
      // decimals are cut, not rounded once more
      {"%5[]v", 3.1416, "3.141"},
      {"%[]v", 99.999, "100.00"},
      // "m" goes ahead of "k" and asks for six zeros
      {"%[km]v", 5000, "5000"},
      {"%[km]v", 5000000, "5m"},
      {"%[k]v", 5000000, "5000k"},
      // no room: no stars, but the sign
      {"%1[]v", -1, "-"},
      // one place more is one comma less in a number that was scaled
      {"%7[,]v", 1234567890, "  1235m"},
      // "i" leaves the decimals where they are
      {"%4[i]v", 1.5, "1.50"},
      {"%[]v", -0.0, "-0"},
  });
}

TEST(zxsfmt_directives, every_lower_case_letter_is_a_flag) {
  expect_good({{"%[s]v", 7, "+7.00"},
               {"%[c]v", 1234567, "1,234,567"},
               {"%.4[z]v", 1.5, "1.5"},
               {"%5[e]v", 1234567, "  ~1m"},
               {"%[kt]v", 5000, "5m"},
               {"%[ghjlnoquvwxy]v", 7, "7.00"},
               {"%[ , ]v", 1234, "1,234"}});
  for (const char* format :
       {"%[A]v", "%[1]v", "%[!]v", "%[-]v", "%[k.]v", "%[%]v", "%[\xE0]v"})
    EXPECT_SFMT_ASSERTION(compose(format, 7));
}

TEST(zxsfmt_directives, what_is_no_number_has_no_picture) {
  constexpr double k_infinity = std::numeric_limits<double>::infinity();
  expect_good({{"%v", std::nan(""), "#ERR"},
               {"%v", k_infinity, "#ERR"},
               {"%[]v", -k_infinity, "#ERR"},
               {"%10.2[+p]v|", std::nan(""), "#ERR|"}});
  EXPECT_EQ(compose("a%v", -1e30), bad("a%v"));
}

TEST(zxsfmt_directives, a_picture_has_39_columns) {
  EXPECT_EQ(compose("%39[]v", 7), good(blanks(35) + "7.00"));
  EXPECT_SFMT_ASSERTION(compose("%40[]v", 7));
  EXPECT_SFMT_ASSERTION(compose("%40v", 7));
  EXPECT_SFMT_ASSERTION(compose("%999[]v", 7));
  EXPECT_SFMT_ASSERTION(compose("%40[b]v", 7));
  EXPECT_EQ(compose("%50[b]v", 0), good(blanks(50)));
}

TEST(zxsfmt_directives, a_picture_has_room_for_every_number) {
  EXPECT_EQ(compose("%.60[]v", 1.5), good("1.5" + std::string(59, '0')));
  EXPECT_EQ(
      compose("%[]v", 1e60),
      good("999999999999999949387135297074018866963645011013410073083904"));
  const double largest = std::numeric_limits<double>::max();
  const std::string text = compose("%[]v", largest).text;
  EXPECT_EQ(text.size(), 309U);
  EXPECT_EQ(text.substr(0, 17), "17976931348623157");
  EXPECT_EQ(compose("%[,]v", largest).text.size(), 309U + 102U);
  EXPECT_EQ(compose("%39[]v", largest), good(std::string(39, '*')));
  EXPECT_EQ(compose("%.3[]v", -largest).text.size(), 1 + 309U + 4);
}

TEST(zxsfmt_directives, the_automatic_precisions_are_a_table) {
  constexpr zxPrecisionTable k_shipped = {0, 500, 100, 0, 5, 0, 0};
  zxPrecisionTable old;
  set_precision_table({9, 0, 0, 1000, 0, 0, 2}, &old);
  EXPECT_EQ(old, k_shipped);
  expect_good({{"%v", 2, "2.000000"},
               {"%v", 3, "3.000"},
               {"%v", 1000, "1,000.000"},
               {"%v", 1001, "1,001"},
               {"%v", 0, "0"},
               {"%.1v", 2, "2.0"}});
  zxPrecisionTable ours;
  set_precision_table(k_shipped, &ours);
  EXPECT_EQ(ours, (zxPrecisionTable{9, 0, 0, 1000, 0, 0, 2}));
  set_precision_table(k_shipped, nullptr);
  expect_good({{"%v", 5, "5.0000"},
               {"%v", 5.5, "5.50"},
               {"%v", 100, "100.00"},
               {"%v", 500, "500.0"},
               {"%v", 500.5, "501"}});
}

// ---- arguments that lie in the text

TEST(zxsfmt_directives, the_text_itself_under_a_placeholder_is_what_it_holds) {
  zxStr text = "old";
  EXPECT_TRUE(sfmt_try(text, "<#>", text));
  EXPECT_EQ(text_of(text), "<<>");
  EXPECT_TRUE(sfmt_try(text, "ab#", zxFmtArg(zxFmtArg::k_text, &text)));
  EXPECT_EQ(text_of(text), "abab");
  EXPECT_TRUE(sfmt_try(text, "#", text));
  EXPECT_EQ(text_of(text), "");
  const std::string large(1000, 'x');
  EXPECT_TRUE(sfmt_try(text, (large + "#").c_str(), text));
  EXPECT_EQ(text_of(text), large + large);
}

TEST(zxsfmt_directives, the_text_itself_under_a_directive_fails_an_assertion) {
  zxStr text = "old";
  EXPECT_SFMT_ASSERTION(sfmt_try(text, "%s", text));
  text = "old";
  EXPECT_SFMT_ASSERTION(sfmt_try(text, "a%5h", text));
}

TEST(zxsfmt_directives, plain_text_within_the_text_fails_an_assertion) {
  for (const char* format : {"#", "a%s", "%z", "a%h"}) {
    zxStr text = "some old text";
    EXPECT_SFMT_ASSERTION(sfmt_try(text, format, text.c_str()));
    zxStr other = "some old text";
    EXPECT_SFMT_ASSERTION(sfmt_try(other, format, other.c_str() + 5));
  }
}

TEST(zxsfmt_directives, a_string_that_shares_with_the_text_is_another_one) {
  for (const char* format : {"a#", "a%s"}) {
    zxStr text = "some old text";
    const zxStr shared = text;
    EXPECT_TRUE(sfmt_try(text, format, shared));
    EXPECT_EQ(text_of(text), "asome old text");
    EXPECT_EQ(text_of(shared), "some old text");
  }
}

TEST(zxsfmt_directives, the_format_may_be_the_text) {
  zxStr text = "<#> %d and more of it";
  EXPECT_TRUE(sfmt_try_s(text, text, "one argument", 2));
  EXPECT_EQ(text_of(text), "<one argument> 2 and more of it");
  text = "<#> %d and more of it";
  EXPECT_TRUE(sfmt_try(text, text.c_str(), "one argument", 2));
  EXPECT_EQ(text_of(text), "<one argument> 2 and more of it");
  text = "a#b%";
  EXPECT_FALSE(sfmt_try_s(text, text, 1));
  EXPECT_EQ(text_of(text), "a1b%");
  text = "a#b";
  EXPECT_EQ(text_of(sfmt_to(text, text.c_str(), 1)), "a1b");
}

TEST(zxsfmt_directives, a_null_text_fails_an_assertion) {
  const char* null = nullptr;
  for (const char* format : {"#", "%s", "%z", "%h", "%d"})
    EXPECT_TRUE(kit::failure_of([&] {
                  compose(format, null);
                }).message.starts_with("1000: "))
        << format;
  kit::with_failures_dropped([&] {
    EXPECT_EQ(compose("<#>", null).text.substr(0, 1), "<");
    compose("<%s>", null);
  });
}

}  // namespace
