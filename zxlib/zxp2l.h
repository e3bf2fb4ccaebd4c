// zxp2l.h - Hebrew reordering, between physical text (display order, code
// page 862 or 1255) and logical text (reading order, code page 1255), and
// from both to Unicode.
//
// Hebrew that was laid out for a character screen stands reversed in memory;
// numbers, dates, amounts and Latin words in it do not.  A line is cut into
// runs of one direction; right-to-left runs are reversed, numbers inside
// them keep their order and brackets are exchanged for their partners.
//
// Bytes 253 and 254 are the marks of left-to-right and right-to-left: read
// as strong characters, written where a number would otherwise join the
// wrong run.  `rtl` is the base direction of the text, true for right to
// left.
//
// Base right to left, Hebrew shown as capitals:
//   physical  ".DCBA abc (12.5%) FE"    logical  "EF (12.5%) abc ABCD."
//
// A run against the base direction without a letter of its own fails an
// assertion (a mark 253 that no Latin letter follows, or 254 likewise); the
// text so far comes back if that is dropped.
#ifndef ZXP2L_H
#define ZXP2L_H

#include "zxstr.h"

// One line of physical text as logical text, and the reverse (which gives
// code page 862 and drops the marks).
zxStr logical_from_phys(const zxStr& text, bool rtl);
zxStr phys_from_logical(const zxStr& text, bool rtl);

// The same for text of several lines, each treated alone; lines are split
// and joined at CR LF.
zxStr logical_from_phys_lines(const zxStr& text, bool rtl);
zxStr phys_from_logical_lines(const zxStr& text, bool rtl);

// Hebrew letters from code page 862 to 1255 in place, and back; no other
// byte changes.
void dos_to_ansi(zxStr& text);
void ansi_to_dos(zxStr& text);

// Text of code page 1255 in UTF-8.  Bytes above the last Hebrew letter, the
// marks among them, are dropped; those from 128 to 223 come out as the code
// points as far below alef as they stand below its byte.
zxStr ansi_to_utf8(const zxStr& text);

#endif  // ZXP2L_H
