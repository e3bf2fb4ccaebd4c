// zxsfmt_picture_test.cpp - number pictures: each flag and each step by rows
// worked out by hand, and the rows of zxsfmt_picture_check.py, which compares
// random ones with a model in Python.
// Tests zxlib/zxsfmt.h and zxsfmt_picture.cpp.
#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <iostream>
#include <limits>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/text.h"
#include "number_model.h"
#include "zxmainf.h"
#include "zxsfmt.h"

namespace {

using kit::text_of;

constexpr char k_bad[] = "bad ";

// What a format makes of one argument, behind k_bad if it fails.
std::string shown(const char* format, const zxFmtArg& arg) {
  zxFmtEnv env;
  zxStr out;
  const bool good = sfmt_core(out, format, env, 1, &arg);
  return (good ? "" : k_bad) + text_of(out);
}

// A directive by the number, the text, and why it is that text.
struct Row {
  const char* format;
  double number;
  const char* text;
  const char* why;
};

void expect_rows(const std::vector<Row>& rows) {
  for (const Row& row : rows)
    EXPECT_EQ(shown(row.format, row.number), row.text)
        << row.format << " of " << row.number << ": " << row.why;
}

// Runs a format that must fail an assertion.
void expect_assertion(const char* format, const zxFmtArg& arg) {
  zxFmtEnv env;
  zxStr out;
  const kit::Failure failure =
      kit::failure_of([&] { sfmt_core(out, format, env, 1, &arg); });
  EXPECT_TRUE(failure.message.starts_with("1000: bailed out: zxsfmt"))
      << format << ": '" << failure.message << "'";
}

// ------------------------------------------------------------- precision --

TEST(zxsfmt_picture, without_a_precision_the_value_chooses_one) {
  expect_rows({
      {"%[]v", 0, "0", "zero has none"},
      {"%[]v", 0.0001, "0.0001", "up to 5 has four"},
      {"%[]v", 0.00001, "0.0000", "what is not zero has four, though unseen"},
      {"%[]v", 3, "3.0000", "whole numbers are no exception"},
      {"%[]v", -3, "-3.0000", "the sign does not count"},
      {"%[]v", 5, "5.0000", "5 still has four"},
      {"%[]v", 5.0000001, "5.00", "above 5 has two"},
      {"%[]v", 99.994, "99.99", "up to 100 has two"},
      {"%[]v", 100, "100.00", "100 still has two"},
      {"%[]v", 99.999, "100.00", "rounding up does not choose again"},
      {"%[]v", 4.99999, "5.0000", "rounding up does not choose again"},
      {"%[]v", 100.001, "100.0", "above 100 has one"},
      {"%[]v", 500, "500.0", "500 still has one"},
      {"%[]v", 500.001, "500", "above 500 has none"},
      {"%[]v", 500.5, "501", "a tie goes away from zero"},
      {"%[]v", 1e22, "10000000000000000000000", "no digit is rounded off"},
  });
}

TEST(zxsfmt_picture, a_given_precision_rounds_ties_away_from_zero) {
  expect_rows({
      {"%.0[]v", 0.5, "1", "a tie"},
      {"%.0[]v", 1.5, "2", "a tie"},
      {"%.0[]v", 2.5, "3", "a tie, not to the even digit"},
      {"%.0[]v", -2.5, "-3", "away from zero on both sides"},
      {"%.0[]v", 0.49999999999999994, "0", "just below a tie"},
      {"%.2[]v", 0.125, "0.13", "a tie"},
      {"%.2[]v", 0.375, "0.38", "a tie"},
      {"%.2[]v", 2.675, "2.67", "the double is below the tie"},
      {"%.2[]v", 1.005, "1.00", "the double is below the tie"},
      {"%.1[]v", 0.25, "0.3", "a tie"},
      {"%.1[]v", 0.35, "0.3", "the double is 0.34999..."},
      {"%.3[]v", 9.9995, "9.999", "the double is 9.99949999..."},
      {"%.0[]v", 999.5, "1000", "a tie that carries"},
      {"%.20[]v", 0.1, "0.10000000000000000555", "all digits are the double's"},
      {"%.0[]v", -0.4, "-0", "the sign was taken before"},
      {"%.2[]v", 7, "7.00", ""},
      {"%.0[]v", 4503599627370497.5, "4503599627370498", "no double is added"},
  });
}

TEST(zxsfmt_picture, the_table_of_precisions_can_be_another) {
  zxPrecisionTable shipped;
  set_precision_table({1e9, 0, 0, 10, 0, 0, 1}, &shipped);
  EXPECT_EQ(shipped, (zxPrecisionTable{0, 500, 100, 0, 5, 0, 0}));
  expect_rows({
      {"%[]v", 0.5, "0.500000", "up to 1 has six"},
      {"%[]v", 1, "1.000000", "1 still has six"},
      {"%[]v", 7, "7.000", "up to 10 has three"},
      {"%[]v", 11, "11", "entry 0 does not count"},
      {"%[]v", 0, "0", "zero does not ask the table"},
  });
  zxPrecisionTable old;
  set_precision_table({0, 8, 4, 2, 0, 0, 0}, &old);
  EXPECT_EQ(old, (zxPrecisionTable{1e9, 0, 0, 10, 0, 0, 1}));
  expect_rows({
      {"%[]v", 1, "1.000", "the highest number of decimals that takes it"},
      {"%[]v", 3, "3.00", ""},
      {"%[]v", 8, "8.0", ""},
      {"%[]v", 9, "9", ""},
  });
  set_precision_table(shipped, nullptr);
  EXPECT_EQ(shown("%[]v", 7.0), "7.00");
}

// ---------------------------------------------------------------- commas --

TEST(zxsfmt_picture, commas_part_thousands) {
  expect_rows({
      {"%[,]v", 999, "999", "three digits have none"},
      {"%[,]v", 1000, "1,000", ""},
      {"%[,]v", 123456, "123,456", "none ahead of the first digit"},
      {"%[,]v", 1234567, "1,234,567", ""},
      {"%[,]v", -1234567, "-1,234,567", "the sign is no digit"},
      {"%[,]v", 999999.5, "1,000,000", "counted after rounding"},
      {"%.4[,]v", 1234.5678, "1,234.5678", "none among the decimals"},
      {"%[,]v", 1e21, "1,000,000,000,000,000,000,000", ""},
      {"%v", 1234567, "1,234,567", "without a picture, too"},
      {"%[]v", 1234567, "1234567", "an empty picture asks for none"},
      {"%10v", 1234567, " 1,234,567", ""},
      {"%.1v", 1234.5, "1,234.5", ""},
  });
}

TEST(zxsfmt_picture, commas_yield_where_there_is_no_room) {
  expect_rows({
      {"%9[,]v", 1234567, "1,234,567", "room for both"},
      {"%8[,]v", 1234567, "1234,567", "room for one, the right one"},
      {"%7[,]v", 1234567, "1234567", "room for none"},
      {"%8.2[,]v", 1234.56, "1,234.56", "it fits exactly"},
      {"%7.2[,]v", 1234.56, "1,234.5", "a decimal goes before a comma"},
      {"%6.2[,]v", 1234.56, " 1,234", "the last decimal takes its point along"},
      {"%5.2[,]v", 1234.56, "1,234", "no decimal is left"},
      {"%4.2[,]v", 1234.56, "1234", "then the comma goes"},
      {"%8[,]v", -1234567, "-1234567", "the sign has its own place"},
      {"%9[,]v", -1234567, "-1234,567", "the sign has its own place"},
  });
}

// ----------------------------------------------------------------- zeros --

TEST(zxsfmt_picture, zeros_at_the_end_of_a_fraction_can_go) {
  expect_rows({
      {"%.4[0]v", 1.5, "1.5", ""},
      {"%.4[0]v", 1.25, "1.25", ""},
      {"%.4[0]v", 1, "1", "the point goes with the last zero"},
      {"%.4[0]v", 1.0001, "1.0001", "zeros inside stay"},
      {"%.2[0]v", 100, "100", "zeros ahead of the point stay"},
      {"%.0[0]v", 100, "100", "without decimals nothing is taken off"},
      {"%.2[0]v", 0.001, "0", "only zeros after rounding"},
      {"%[0]v", 7, "7", "with the precision that the value chose"},
      {"%.3[0]v", -0.5, "-0.5", ""},
      {"%.2[0,]v", 1000, "1,000", "what goes makes no difference to commas"},
  });
}

TEST(zxsfmt_picture, a_fraction_of_nothing_but_zeros_can_go_alone) {
  expect_rows({
      {"%.4[i]v", 1, "1", ""},
      {"%.4[i]v", 1.5, "1.5000", "zeros behind another digit stay"},
      {"%.4[i]v", 1.0001, "1.0001", ""},
      {"%.2[i]v", 100, "100", ""},
      {"%.0[i]v", 100, "100", "without decimals nothing is taken off"},
      {"%.3[i]v", 0, "0", ""},
      {"%.2[i]v", 0.001, "0", "only zeros after rounding"},
      {"%.4[0i]v", 1.5, "1.5", "with both, zeros go"},
  });
}

// -------------------------------------------------------------- suffixes --

TEST(zxsfmt_picture, whole_thousands_and_millions_can_have_a_suffix) {
  expect_rows({
      {"%[k]v", 5000, "5k", ""},
      {"%[k]v", 12000, "12k", ""},
      {"%[k]v", -12000, "-12k", ""},
      {"%[k]v", 10000, "10k", "three zeros, not all"},
      {"%[k]v", 5000000, "5000k", "three zeros, not all"},
      {"%[k]v", 5500, "5500", "two zeros are not enough"},
      {"%.0[k]v", 500, "500", "two zeros are not enough"},
      {"%[k]v", 0, "0", "one zero is not enough"},
      {"%[k]v", 4999.7, "5k", "counted after rounding"},
      {"%[m]v", 5000000, "5m", ""},
      {"%[m]v", 5000, "5000", "three zeros are not enough"},
      {"%[m]v", 5500000, "5500000", "five zeros are not enough"},
      {"%[km]v", 5000, "5000", "with both, six zeros are asked for"},
      {"%[km]v", 5000000, "5m", ""},
      {"%.2[k]v", 5000, "5000.00", "a fraction is in the way"},
      {"%.2[k0]v", 5000, "5k", "a fraction that goes is not"},
      {"%.2[ki]v", 5000, "5k", "a fraction that goes is not"},
      {"%.2[ki]v", 5000.5, "5000.50", "a fraction that stays is"},
      {"%[k,]v", 1234000, "1,234k", "commas count digits"},
      {"%[k,]v", 123000, "123k", "a suffix is no digit"},
  });
}

TEST(zxsfmt_picture, of_values_in_thousands_suffixes_are_one_higher) {
  expect_rows({
      {"%[kK]v", 5000, "5m", ""},
      {"%[mK]v", 5000000, "5b", ""},
      {"%[K]v", 5000, "5000", "it asks for no suffix by itself"},
      {"%5[K]v", 1234567, "1235m", "thousands of thousands"},
      {"%4[K]v", 1234567, "  1b", "millions of thousands"},
  });
}

TEST(zxsfmt_picture, what_does_not_fit_is_scaled) {
  expect_rows({
      {"%7[]v", 1234567, "1234567", "it fits exactly"},
      {"%6[]v", 1234567, " 1235k", "scaled and rounded"},
      {"%5[]v", 1234567, "1235k", "it fits exactly"},
      {"%4[]v", 1234567, "  1m", "scaled twice"},
      {"%3[]v", 1500, " 2k", "a tie of thousands"},
      {"%3[]v", 2500, " 3k", "a tie of thousands"},
      {"%3[]v", 1499, " 1k", ""},
      {"%7[]v", 123456789012, "123457m", ""},
      {"%6[]v", 123456789012, "******", "twice is the most"},
      {"%5[]v", 123456789012, "*****", ""},
      {"%4.3[]v", 12345.678, " 12k", "scaled, there are no decimals"},
      {"%2[]v", 999999, "1m", "1000k does not fit"},
      {"%5[]v", 999999, "1000k", "it rounds up and keeps its suffix"},
      {"%4[]v", -1234567, " -1m", "the sign has its own place"},
  });
}

TEST(zxsfmt_picture, scaled_numbers_can_lose_their_zeros_once_more) {
  expect_rows({
      {"%4[k]v", 5000000, "  5m", "5000k is too long, and then k is spent"},
      {"%6[m]v", 1234000400, " 1234m", "once scaled, m stands for k"},
      {"%6[mK]v", 1234000400, " 1234b", "the same, one higher"},
      {"%5[m]v", 12345000000, "*****", "no level makes it shorter"},
      {"%6[m]v", 12345000000, "12345m", ""},
  });
}

TEST(zxsfmt_picture, a_scaled_number_has_a_comma_less_than_fit) {
  expect_rows({
      {"%7[,]v", 1234567890, "  1235m", "one fits"},
      {"%9[,]v", 1234567890, " 1234568k", "one fits"},
      {"%8[,]v", 1234567890, "1234568k", "none fits"},
      {"%10[,]v", 1234567890123, " 1234,568m", "two fit"},
      {"%9[,]v", 1234567890123, " 1234568m", "one fits"},
  });
}

// -------------------------------------------------- cut decimals, the "~" --

TEST(zxsfmt_picture, decimals_are_cut_to_fit_and_not_rounded) {
  expect_rows({
      {"%6[]v", 3.14159, "3.1416", "it fits exactly"},
      {"%5[]v", 3.14159, "3.141", "cut off the rounded text"},
      {"%4[]v", 3.14159, "3.14", ""},
      {"%3[]v", 3.14159, "3.1", ""},
      {"%2[]v", 3.14159, " 3", "a point at the end goes, too"},
      {"%1[]v", 3.14159, "3", ""},
      {"%4.4[]v", 1.9999, "1.99", "never up"},
      {"%5.2[]v", 99.999, "100.0", ""},
      {"%5.3[]v", 12345.678, "12345", ""},
      {"%4[i]v", 1.5, "1.50", "kept zeros are decimals to cut"},
      {"%3[i]v", 1.5, "1.5", "kept zeros are decimals to cut"},
      {"%5[]v", -3.14159, "-3.14", "the sign has its own place"},
  });
}

TEST(zxsfmt_picture, a_tilde_tells_that_digits_were_dropped) {
  expect_rows({
      {"%6[~]v", 3.14159, "3.1416", "rounding is no dropping"},
      {"%5[~]v", 3.14159, "~3.14", "one decimal more goes for its place"},
      {"%3[~]v", 3.14159, " ~3", "the point gives its place"},
      {"%2[~]v", 3.14159, "~3", ""},
      {"%1[~]v", 3.14159, "*", "~3 is too long, so are ~0k and ~0m"},
      {"%7[~]v", 1234567, "1234567", ""},
      {"%6[~]v", 1234567, "~1235k", "scaled"},
      {"%5[~]v", 1234567, "  ~1m", "~1235k is too long"},
      {"%3[~]v", 5000, "~5k", "scaled, though no digit was lost"},
      {"%3[~k]v", 5000, " 5k", "a suffix alone is exact"},
      {"%.0[~]v", 2.5, "3", ""},
      {"%6[~]v", -1234567, "  -~1m", "behind the sign"},
  });
}

// ------------------------------------------------------------------ signs --

TEST(zxsfmt_picture, signs_have_their_places) {
  expect_rows({
      {"%.1[]v", -12.5, "-12.5", ""},
      {"%.1[+]v", 12.5, "+12.5", ""},
      {"%.1[+]v", -12.5, "-12.5", ""},
      {"%.1[+]v", 0, "+0.0", "zero as well"},
      {"%.1[r]v", -12.5, "12.5-", ""},
      {"%.1[r]v", 12.5, "12.5", ""},
      {"%.1[r+]v", 12.5, "12.5+", ""},
      {"%.1[f]v", -12.5, "(12.5)", ""},
      {"%.1[f]v", 12.5, "12.5", ""},
      {"%.1[f+]v", 12.5, "+12.5", ""},
      {"%.1[f+r]v", 12.5, "12.5+", ""},
      {"%.1[fr]v", -12.5, "(12.5)", "parentheses go before"},
      {"%.1[a]v", -12.5, "12.5", ""},
      {"%.1[af]v", -12.5, "12.5", "no longer negative"},
      {"%.1[a+]v", -12.5, "+12.5", "no longer negative"},
      {"%.1[]v", -0.0, "-0.0", "a negative zero is not below zero"},
  });
}

TEST(zxsfmt_picture, signs_and_marks_take_room) {
  expect_rows({
      {"%6.0[]v", -12345, "-12345", ""},
      {"%5.0[]v", -12345, " -12k", "one place for the sign"},
      {"%6.0[r]v", -12345, "12345-", ""},
      {"%7.0[f]v", -12345, "(12345)", ""},
      {"%6.0[f]v", -12345, " (12k)", "two places for parentheses"},
      {"%5.0[f]v", 12345, "12345", "only if they are shown"},
      {"%5.0[a]v", -12345, "12345", "none for a sign that is dropped"},
      {"%6.0[+]v", 12345, "+12345", ""},
      {"%5.0[+]v", 12345, " +12k", ""},
      {"%5.0[d]v", 12345, " 12k$", ""},
      {"%6.0[p]v", 123.45, "12345%", ""},
      {"%5.0[p]v", 123.45, " 12k%", ""},
  });
}

TEST(zxsfmt_picture, without_room_there_is_the_sign_alone) {
  expect_rows({
      {"%1[]v", -1, "-", "no room, so no star"},
      {"%2[]v", -12, "-*", "one place, one star"},
      {"%2[pd]v", 1, "%$", "both marks, no star"},
      {"%1[pd]v", -1, "-%$", "room below nothing, the width does not cut"},
      {"%2[f]v", -1, "()", ""},
      {"%0.0[]v", 7, "", "a width of nothing is a width"},
  });
}

TEST(zxsfmt_picture, percent_and_dollar_follow_the_number) {
  expect_rows({
      {"%[p]v", 0.25, "25.00%", "the precision is that of 25"},
      {"%[p]v", 0.05, "5.0000%", "the precision is that of 5"},
      {"%[p]v", 5, "500.0%", "the precision is that of 500"},
      {"%[p]v", 0, "0%", ""},
      {"%.0[p]v", 0.125, "13%", "a tie of 12.5"},
      {"%8[p]v", 0.25, "  25.00%", ""},
      {"%[d]v", 99.5, "99.50$", ""},
      {"%[dp]v", 0.25, "25.00%$", "in this order"},
      {"%.1[rp]v", -0.125, "12.5-%", "behind the sign"},
      {"%.1[fd]v", -12.5, "(12.5)$", "behind the parentheses"},
  });
}

// ------------------------------------------------------- width and blanks --

TEST(zxsfmt_picture, blanks_stand_ahead_up_to_the_width) {
  expect_rows({
      {"%8.2[]v", 1.5, "    1.50", ""},
      {"%08.2[]v", 1.5, "    1.50", "a zero is a digit of the width"},
      {"%8.1[f]v", -1.5, "   (1.5)", ""},
      {"%39.0[]v", 1, "                                      1", ""},
      {"x%4.0[]v|", 7, "x   7|", "counted from where the number begins"},
  });
}

TEST(zxsfmt_picture, zero_can_be_blank) {
  expect_rows({
      {"%[b]v", 0, "", ""},
      {"%4[b]v", 0, "    ", ""},
      {"%4[b]v", -0.0, "    ", ""},
      {"%6.2[b+pd]v", 0, "      ", "whatever else is asked for"},
      {"%4.1[b]v", 0.01, " 0.0", "not what only looks like zero"},
      {"%42[b]v", 0, "                                          ",
       "blanks have no limit of 40"},
      {"a%[b]vb", 0, "ab", ""},
  });
  EXPECT_EQ(shown("%3[b]v", 0), "   ");
  EXPECT_EQ(shown("%3[b]v", '\0'), "   ");
}

TEST(zxsfmt_picture, a_width_of_forty_fails_an_assertion) {
  EXPECT_EQ(shown("%39[]v", 1000.0), std::string(35, ' ') + "1000");
  expect_assertion("%40[]v", 1000.0);
  expect_assertion("%40v", 1000.0);
  expect_assertion("%400[b]v", 1.0);
  expect_assertion("%99999999999[]v", 1.0);
}

// -------------------------------------------------------------- arguments --

TEST(zxsfmt_picture, all_numbers_are_taken) {
  constexpr auto k_lowest = std::numeric_limits<std::int32_t>::min();
  EXPECT_EQ(shown("%v", 7), "7.00");
  EXPECT_EQ(shown("%v", 3), "3.0000");
  EXPECT_EQ(shown("%v", k_lowest), "-2,147,483,648");
  EXPECT_EQ(shown("%v", long{-600}), "-600");
  EXPECT_EQ(shown("%v", 4'000'000'000U), "4,000,000,000");
  EXPECT_EQ(shown("%v", 4'000'000'000UL), "4,000,000,000");
  EXPECT_EQ(shown("%v", '\xC8'), "-56.00");
  EXPECT_EQ(shown("%v", static_cast<unsigned char>(200)), "200.0");
}

TEST(zxsfmt_picture, what_is_no_number_fails) {
  const zxStr text = "text";
  const zxDate date;
  zxFmtArg truth = 1;
  truth.tag = zxFmtArg::k_bool;
  const zxFmtArg args[] = {truth, text, date, "12", &text};
  for (const zxFmtArg& arg : args)
    EXPECT_EQ(shown("a%5.2[,]vb", arg), "bad a%5.2[,]vb") << arg.tag;
}

TEST(zxsfmt_picture, one_number_stands_for_none) {
  expect_rows({
      {"a%[]v b", -1e30, "bad a%[]v b", ""},
      {"%9[b]v", -1e30, "bad %9[b]v", ""},
      {"%9[]v", -1e29, "-********", ""},
      {"%3[]v", 1e30, "***", "the other sign is a number"},
  });
  EXPECT_EQ(shown("%[a]v", std::nextafter(-1e30, 0)),
            "999999999999999879147136483328");
}

TEST(zxsfmt_picture, infinity_and_nan_are_told_without_blanks) {
  using limits = std::numeric_limits<double>;
  for (const double number :
       {limits::infinity(), -limits::infinity(), limits::quiet_NaN()}) {
    EXPECT_EQ(shown("%v", number), "#ERR");
    EXPECT_EQ(shown("a%9.2[b+pd,]v|", number), "a#ERR|");
    EXPECT_EQ(shown("%2[]v", number), "#ERR");
  }
}

TEST(zxsfmt_picture, the_largest_numbers_have_all_their_digits) {
  const double two_to_1000 = std::ldexp(1.0, 1000);
  const std::string whole = shown("%.3[]v", two_to_1000);
  EXPECT_EQ(whole.size(), 302U + 4U);
  EXPECT_EQ(whole.substr(0, 20), "10715086071862673209");
  EXPECT_EQ(whole.substr(282), "24386837205668069376.000");
  EXPECT_EQ(shown("%[,]v", -1e308).size(), 1U + 309U + 102U);
  EXPECT_EQ(shown("%20[]v", 1.7976931348623157e308), std::string(20, '*'));
  EXPECT_EQ(shown("%[p]v", 1.7976931348623157e308), "inf%");
  EXPECT_EQ(shown("%.7[]v", 5e-324), "0.0000000");
}

// No double has more than 1074 decimals; from then on they are zeros.
TEST(zxsfmt_picture, any_precision_is_served) {
  for (const double number : {5e-324, 0.1, 1.7976931348623157e308})
    for (const int precision : {60, 1072, 1073, 1074, 1075, 1100, 2000})
      EXPECT_EQ(
          shown(("%." + std::to_string(precision) + "[]v").c_str(), number),
          number_model::fixed(number_model::exact(number), precision, false));
  EXPECT_EQ(shown("%.100000[0]v", 0.5), "0.5");
}

// --------------------------------------------------------- pictures as text --

TEST(zxsfmt_picture, flags_have_letters_and_blanks_are_skipped) {
  expect_rows({
      {"%.0[ , ]v", 1234, "1,234", "blanks are skipped"},
      {"%.0[c]v", 1234, "1,234", "c is the comma"},
      {"%.0[s]v", 1234, "+1234", "s is the plus"},
      {"%.2[z]v", 1.5, "1.5", "z is the zero"},
      {"%3.0[e]v", 1234, "~1k", "e is the tilde"},
      {"%[kt]v", 5000, "5m", "t is the K"},
      {"%.0[ghjlnoquvwxy]v", -1234, "-1234", "others have no meaning"},
      {"%.0[,,++]v", 1234, "+1,234", "twice is once"},
  });
}

TEST(zxsfmt_picture, other_bytes_of_a_picture_fail_an_assertion) {
  for (const char* format :
       {"%[A]v", "%[,Z]v", "%[1]v", "%[-]v", "%[$]v", "%[.]v", "%[%]v",
        "%[\t]v", "%[`]v", "%[{]v", "%[\xE0]v", "%[/]v", "%[:]v", "%[@]v"})
    expect_assertion(format, 1.0);
}

TEST(zxsfmt_picture, flags_ahead_of_the_width_fail_an_assertion) {
  for (const char* format : {"%-5[]v", "%+[,]v", "% 5[]v", "%#[]v", "%5[]lv",
                             "%-5v", "%+v", "%lv", "%5.2lv"})
    expect_assertion(format, 1.0);
}

TEST(zxsfmt_picture, the_text_ahead_is_left_alone) {
  expect_rows({
      {"10.00%.2[0]v", 0, "10.000", "its zeros are not taken off"},
      {"10.%.0[0]v", 0, "10.0", "its point is not taken off"},
      {"1000%.0[k]v", 5, "10005", "its zeros make no thousands"},
      {"123%.0[,]v", 456, "123456", "its digits want no comma"},
      {"xk%3.1[]v", 1.5, "xk1.5", "its letter is no suffix"},
      {"-%2[]v.", 123456789012, "-**.", ""},
  });
}

TEST(zxsfmt_picture, a_format_can_have_many) {
  EXPECT_EQ(text_of(sfmt("#:%8.2[,]v|%[kd]v|%v%%", "a", -1234.5, 5000, 0)),
            "a:-1,234.5|5k$|0%");
}

// ------------------------------------------------ rows of the random check --

// A row is the tag of a number, the number, in decimal or as the bits of a
// double in hexadecimal, and the format that takes it:
//
//   f 3ff8000000000000 a%9[,]vb
//
zxFmtArg arg_of(char tag, const std::string& text) {
  if (tag == 'f')
    return std::bit_cast<double>(std::uint64_t{std::stoull(text, nullptr, 16)});
  const auto word = static_cast<std::uint32_t>(std::stoll(text));
  switch (tag) {
    case 'u':
      return word;
    case 'v':
      return static_cast<unsigned long>(word);
    case 'l':
      return static_cast<long>(static_cast<std::int32_t>(word));
    case 'c':
      return static_cast<char>(word);
    case 'b':
      return static_cast<unsigned char>(word);
    default: {
      zxFmtArg arg = static_cast<std::int32_t>(word);
      arg.tag = static_cast<std::uint32_t>(tag);
      return arg;
    }
  }
}

// What no row makes is shown so that it cannot pass for a row's end.
std::string visible(std::string_view text) {
  std::string shown_text;
  for (const char c : text) {
    if (c >= ' ' && c <= '~') {
      shown_text += c;
      continue;
    }
    char code[8];
    std::snprintf(code, sizeof code, "\\x%02x", static_cast<unsigned char>(c));
    shown_text += code;
  }
  return shown_text;
}

// The answer is "good" or "bad" and the text.
std::string answer(const std::string& row) {
  const std::size_t blank = row.find(' ', 2);
  const zxFmtArg arg = arg_of(row[0], row.substr(2, blank - 2));
  zxFmtEnv env;
  zxStr out;
  const bool good = sfmt_core(out, row.c_str() + blank + 1, env, 1, &arg);
  return (good ? "good " : "bad ") + visible(out.view());
}

// Answers each row of the standard input with a line.
ZX_CASE(zxsfmt_picture_rows) {
  init_zxlib_args(argc, argv);
  for (std::string row; std::getline(std::cin, row);) {
    std::printf("%s\n", answer(row).c_str());
    std::fflush(stdout);  // should the next row end the process
  }
  return 0;
}

TEST(zxsfmt_picture, rows_are_answered) {
  kit::ProcessOptions options;
  options.input =
      "f 3ff8000000000000 a%9[,]vb\n"
      "i -7 %v\n"
      "c -7 %v\n"
      "b 200 %[k,]v\n"
      "l -2147483648 %v|\n"
      "u 4294967295 %v\n"
      "v 4294967295 %v\n"
      "B 1 x%[m]v\n";
  std::string out = kit::run_case("zxsfmt_picture_rows", {}, options).out;
  std::erase(out, '\r');
  EXPECT_EQ(out,
            "good a   1.5000b\n"
            "good -7.00\n"
            "good -7.00\n"
            "good 200.0\n"
            "good -2,147,483,648|\n"
            "good 4,294,967,295\n"
            "good 4,294,967,295\n"
            "bad x%[m]v\n");
}

}  // namespace
