// vtx2csv.h - the export of the securities table as one CSV file.
//
// The file is one header line of field codes and one line for each live
// record; cells are separated by a comma and a blank.  The header ends in
// two CR LF pairs, every other line in a single line feed.  There is no
// quoting: the quotes and commas of text cells are deleted instead.  All of
// this is the contract with the file's readers.
#ifndef VTX2CSV_H
#define VTX2CSV_H

#include <cstdint>
#include <span>

#include "r9qvtxdb.h"
#include "zxbfile.h"
#include "zxstr.h"

// How a cell is made; a column holds the address of one of these.
inline constexpr char k_num[] = "num";        // a decimal
inline constexpr char k_text[] = "text";      // a text, cleaned
inline constexpr char k_natype[] = "natype";  // the letter of the type
inline constexpr char k_date[] = "date";      // dd-mm-yy

struct ColumnDef {
  const char* code;    // the header text
  const char* type;    // one of the four above
  std::int32_t index;  // of the record's field of that type; -1 for none
};

// The columns in output order: every text, decimal and date of a record and
// its type, each once.
inline constexpr ColumnDef g_columns[] = {
    // clang-format off
    {"seccode", k_num, 0}, {"37424", k_text, 0}, {"37425", k_natype, -1},
    {"37426", k_text, 1}, {"37427", k_text, 2}, {"37428", k_text, 8},
    {"37429", k_text, 3}, {"37430", k_text, 4}, {"37431", k_text, 5},
    {"37432", k_text, 6}, {"37433", k_text, 7}, {"37434", k_num, 49},
    {"37435", k_num, 52}, {"37437", k_num, 1}, {"37438", k_num, 2},
    {"37439", k_num, 3}, {"37440", k_num, 4}, {"37441", k_num, 5},
    {"37442", k_num, 6}, {"37443", k_num, 7}, {"37444", k_num, 8},
    {"37445", k_num, 9}, {"37446", k_num, 10}, {"37447", k_num, 11},
    {"37448", k_num, 12}, {"37449", k_num, 13}, {"37450", k_num, 14},
    {"37451", k_num, 15}, {"37452", k_num, 16}, {"37453", k_num, 17},
    {"37454", k_num, 18}, {"37455", k_num, 19}, {"37456", k_num, 20},
    {"37457", k_num, 21}, {"37458", k_num, 22}, {"37459", k_num, 23},
    {"37460", k_num, 24}, {"37461", k_num, 25}, {"37462", k_num, 26},
    {"37463", k_num, 27}, {"37464", k_num, 28}, {"37465", k_num, 29},
    {"37466", k_num, 30}, {"37467", k_num, 31}, {"37468", k_num, 32},
    {"37469", k_num, 33}, {"37470", k_num, 34}, {"37471", k_num, 35},
    {"37472", k_num, 36}, {"37473", k_num, 37}, {"37474", k_num, 38},
    {"37475", k_num, 39}, {"37476", k_num, 40}, {"37477", k_num, 41},
    {"37478", k_num, 42}, {"37479", k_num, 43}, {"37480", k_num, 44},
    {"37481", k_num, 45}, {"37482", k_num, 46}, {"37483", k_num, 47},
    {"37484", k_num, 48}, {"37485", k_num, 50}, {"37486", k_num, 51},
    {"37487", k_date, 0}, {"37488", k_date, 1}, {"37489", k_date, 2},
    {"37490", k_date, 3}, {"37491", k_date, 4}, {"37492", k_date, 5},
    {"37493", k_date, 6}, {"37494", k_date, 7}, {"37495", k_date, 8},
    {"37496", k_date, 9}, {"37497", k_date, 10}, {"37498", k_date, 11},
    // clang-format on
};
static_assert(std::size(g_columns) == 75);

// Writes the header line.  A code that stands twice is fatal.
void write_header_row(zxBFile& out,
                      std::span<const ColumnDef> columns = g_columns);

// Writes the line of a record.  A column of unknown type is fatal, and so are
// an index outside the record's fields, a date outside the calendar and a
// text whose direction marks cannot be right (assertions).
void write_record_row(const VtxRecord& record, zxBFile& out,
                      std::span<const ColumnDef> columns = g_columns);

// A text field as it stands in the file: in logical order, in UTF-8, without
// double quotes and commas, which go last, so that they still hold numbers
// together in the reordering.
zxStr clean_text_field(const zxStr& text);

#endif  // VTX2CSV_H
