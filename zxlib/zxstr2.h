// zxstr2.h - operations on strings beyond the class: parts of a text,
// numbers read from it, searching, prefixes and suffixes, escapes, splitting.
//
// The style is common to all: a parser never fails, a bad number reads as 0;
// a search gives an index or -1; a mistake of the program (a negative index, a
// null text) fails an assertion.  If that is dropped, a null text counts as an
// empty one, and everything else gives the result for nothing.
//
// White space is blank and bytes 9 to 13; only ASCII letters have two cases.
// NUL is a character like any other, except where a function says otherwise.
//
// trim() and strip_line_end() are in zxstr.h, cut_first() and cut_next() in
// zxstrm2.h, reading of dates and times in zxdate.h and zxtime.h.
#ifndef ZXSTR2_H
#define ZXSTR2_H

#include <cstdint>
#include <string_view>

#include "zxqva.h"
#include "zxstr.h"

// A text to be read: characters that someone else keeps.  Operations take
// strings, plain text, a pointer with a length, and views.
//
// Null text and a negative length are no text: they fail an assertion, and
// count as empty if that is dropped.
class zxChars {
 public:
  zxChars(const char* text);
  zxChars(const char* characters, std::int32_t length);
  zxChars(const zxStr& text)
      : chars(text.check() ? text.view() : std::string_view()) {}
  constexpr zxChars(std::string_view text) : chars(text) {}

  constexpr std::string_view view() const { return chars; }

 private:
  std::string_view chars;
};

// ----------------------------------------------------------------- parts --

// The parts of a text share its representation if they are all of it.

// The text from position n on; n outside of 0 to the length fails an
// assertion and gives an empty text.
zxStr rest(const zxStr& text, std::int32_t n);

// Up to `length` characters from a position on.  A negative position counts
// as 0, the length staying as it is; a length up to 0 and a position at or
// behind the end give an empty text, and the end is clipped.
zxStr sub(const zxStr& text, std::int32_t position, std::int32_t length);

// sub() up to the end of the text: from(text, -3) is all of it.
zxStr from(const zxStr& text, std::int32_t position);

// The last character; of an empty text an assertion, and NUL.
char last_char(zxChars text);

// Takes the last character off; the empty text fails an assertion in
// pop_char(), and both give NUL for it.
char pop_char(zxStr& text);
char pop_char_or0(zxStr& text);

// --------------------------------------------------------------- numbers --

// A decimal whole number with white space at both ends ignored: a sign;
// digits, with commas between them once the number is above 0; as the last
// character k or K for thousands, m or M for millions.  Anything else is 0.
//
// The number wraps in 32 bits, and one that turns negative on the way is 0:
// "2147483648" is 0, "99999999999" is 1215752191.  K and M are refused
// (0) for numbers that would not fit, k and m wrap.
std::int32_t parse_long(zxChars text);

// A number with white space at both ends ignored: a sign; digits, commas
// allowed between two of them; a point and digits.  Then nothing; or one of k
// K, m M, g G for 10^3, 10^6, 10^9; or e or E, a sign and digits.  Anything
// else is 0.  The nearest double; beyond the largest one infinity.
double parse_double(zxChars text);

// Hexadecimal digits of either case; blanks (only these) and one "0x" or "0X"
// ahead of them, one h or H behind them.  Anything else is 0.  Digits beyond
// the eighth push the first ones out.
std::uint32_t parse_hex(zxChars text);

// ------------------------------------------------------------- searching --

// Where `what` stands first at or behind a position; -1 if nowhere, and from
// the text's end on.  An empty text is found at the position itself, so that
// only an empty text does not contain one.  A negative position fails an
// assertion.
std::int32_t find(zxChars text, std::int32_t position, zxChars what);
std::int32_t find(zxChars text, std::int32_t position, const char* what,
                  std::int32_t length);
std::int32_t find(zxChars text, zxChars what);
std::int32_t find_char(zxChars text, std::int32_t position, char byte);
std::int32_t find_char(zxChars text, char byte);

bool contains(zxChars text, zxChars what);
bool contains(zxChars text, char byte);

// True if the text begins or ends with another; every text does so with an
// empty one.  The forms with "i" do not regard the case of ASCII letters,
// and take two texts that are alike up to a NUL in both for alike.
bool starts_with(zxChars text, zxChars start);
bool starts_with(zxChars text, const char* start, std::int32_t length);
bool starts_with(zxChars text, char start);
bool istarts_with(zxChars text, zxChars start);
bool istarts_with(zxChars text, const char* start, std::int32_t length);
bool istarts_with(zxChars text, char start);
bool ends_with(zxChars text, zxChars end);
bool ends_with(zxChars text, const char* end, std::int32_t length);
bool ends_with(zxChars text, char end);
bool iends_with(zxChars text, zxChars end);
bool iends_with(zxChars text, const char* end, std::int32_t length);
bool iends_with(zxChars text, char end);

// ------------------------------------------------------------------ case --

// ASCII letters in place, and as a copy, which shares the representation if
// there is nothing to change.
void lower(zxStr& text);
void upper(zxStr& text);
zxStr lowered(const zxStr& text);
zxStr uppered(const zxStr& text);

// --------------------------------------------------------------- escapes --

// The text with control characters, quotes and backslashes written as
// escapes, which unescape() reads back; "~" as well if `tilde`.
//
//   0 \0   7 \a   8 \b   9 \t   10 \n   12 \f   13 \r   " ' \ with a \ ahead
//   others below 32 as \x0B
//
// Shares the representation if there is nothing to escape.
zxStr escape(const zxStr& text, bool tilde);

// Reads the escapes above; "\x" takes the next two characters (fewer at the
// end) as parse_hex() does, any other character behind "\" stands for
// itself, and a "\" at the very end is dropped.
zxStr unescape(const zxStr& text);

// ------------------------------------------------------------- splitting --

// Splits a text at the matches of a pattern (zxregexc.h; a length of -1 for
// one that ends with NUL) into at most `max` pieces, which replace the
// contents of `out`; the result is their number.
//
// A match is looked for behind the one before it; an empty one at that very
// place is passed over for the next from one byte further on.  Ahead of each
// match there is a piece, left out if it is empty unless `keep_empty`; the
// groups 1 to 9 that took part follow as pieces of their own under the same
// rule, up to max - 1 pieces in all.  What is left of the text, if anything,
// is the last piece: for a `max` of 1 and below it is the only one, and
// behind a match at the text's end there is none.  "^" never matches.
//
// Pattern texts are kept compiled by their address (zxstrm.h), pattern
// strings are compiled at each call.
//
// Text and pattern may be elements of `out`.  A bad pattern is message 1752 or
// 1751, and gives no pieces if that is dropped.  The match record is left
// empty.
std::int32_t split_regex(zxQVA<zxStr>& out, const zxStr& text,
                         const char* pattern, std::int32_t pattern_length,
                         std::int32_t max, bool keep_empty);
std::int32_t split_regex(zxQVA<zxStr>& out, const zxStr& text,
                         const zxStr& pattern, std::int32_t max,
                         bool keep_empty);

#endif  // ZXSTR2_H
