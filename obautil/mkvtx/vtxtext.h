// vtxtext.h - the text form of a table of securities: one word and its value
// in a line, UTF-8, Hebrew in reading order.  docs/mkvtx.md has the grammar.
//
//   table-date 2026-11-20
//   security 1001 ALON
//     type B
//     text 1 אלון תעשיות בע"מ
//     num 1 12.5
//     date 0 2001-02-28
//   no-record 1002 BROSH
#ifndef VTXTEXT_H
#define VTXTEXT_H

#include <cstdint>
#include <string_view>

#include "vtxtable.h"
#include "zxstr.h"

// What is wrong with a text, and in which of its lines, counted from 1.
struct VtxTextError {
  std::int32_t line = 0;
  zxStr what;
};

// Makes the table that a text describes.  REQUIRES: `table` is as new.
// False, and the first error stored, if the text is not good; the table is
// then of no use.
bool parse_vtx_text(std::string_view text, VtxTable& table,
                    VtxTextError& error);

// The same for a file ("-" is the standard input).  An error in it ends the
// process with "file(line): what is wrong", where the file is named without
// its folders if they are long; one that can't be opened with 1002.  False
// only if that failure was dropped.
bool load_vtx_text(const zxStr& file_name, VtxTable& table);

#endif  // VTXTEXT_H
