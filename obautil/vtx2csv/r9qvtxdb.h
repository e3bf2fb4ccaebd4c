// r9qvtxdb.h - the lookup database: reader and small writer of the table of
// securities, a pair of files in one directory.
//
// The index names each security and says where its record lies in the data
// file.  Each file is looked for under its D4W name first and under its R9Q
// name then, apart from the other; the writer always writes the D4W index.
// All numbers are little-endian and nothing is padded; docs/table-format.md
// has the byte tables.
//
// One table is open per process, in the module's own state.  An init_vtx()
// that fails behind the index leaves it half open: only vtx_close() closes
// it again.  Operations on a table that is not open are fatal with 500
// unless they return a code.  A seek, a write or a close that fails is fatal
// with the message of the file class.
#ifndef R9QVTXDB_H
#define R9QVTXDB_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "hvldec.h"
#include "zxdate.h"
#include "zxle.h"
#include "zxstr.h"

// ---- the files

inline constexpr char k_d4w_index_name[] = "D4WVTX.IDX";
inline constexpr char k_d4w_data_name[] = "D4WVTX.BIN";
inline constexpr char k_r9q_index_name[] = "R9QVTX.IDX";
inline constexpr char k_r9q_data_name[] = "R9QVTX.BIN";

// The head of the index; `count` entries follow.
struct VtxIndexHead {
  static constexpr std::uint32_t k_magic = 4321501;
  zxLe<std::uint32_t> magic;
  zxLe<std::int16_t> count;  // at least 1
};
static_assert(sizeof(VtxIndexHead) == 6);

struct VtxIndexEntry {
  static constexpr std::int32_t k_no_record = -1;
  char name[16];  // short name, NUL-terminated
  zxLe<std::int32_t> code;
  zxLe<std::int32_t> offset;  // of the record in the data file, or -1
};
static_assert(sizeof(VtxIndexEntry) == 24);

// The head of the data file.  `id` and `version` read together as one
// NUL-terminated text such as "R9QVTX101".
struct VtxDataHead {
  char id[6];        // "R9QVTX"
  char version[3];   // three digits, at least 101
  std::uint8_t end;  // the NUL of that text; 26 while closed
  std::uint8_t unused;
  zxLe<std::uint32_t> stamp;
  std::uint8_t rest[40];
};
static_assert(sizeof(VtxDataHead) == 55);
static_assert(offsetof(VtxDataHead, stamp) == 11);

// A date as it lies in a record.
struct VtxDate {
  zxLe<std::int16_t> days;
  VtxDate& operator=(zxDate date) {
    days = date.days();
    return *this;
  }
  operator zxDate() const { return zxDate::from_stored(days); }
};

// A record of the data file, byte for byte.
struct VtxRecord {
  static constexpr int k_texts = 9;
  static constexpr int k_nums = 53;
  static constexpr int k_dates = 12;
  static constexpr std::size_t k_text_size = 65;

  VtxDate date;             // of the table; only the first record's is used
  zxLe<std::int16_t> type;  // 0 to 2
  char text[k_texts][k_text_size];  // NUL-terminated, in display order
  HvlDecimal num[k_nums];           // num[0] is the security's code
  VtxDate dates[k_dates];
  std::uint8_t blocks[2][167];  // each begins with two HvlDecimal
  std::uint8_t tail[100];

  // Sets the date, the numbers, the dates and the first two numbers of each
  // block to zero and leaves all other bytes alone.
  VtxRecord();

  // Text field i up to its NUL.  A field without one runs on into what
  // follows it, to the record's end at most.
  std::string_view text_field(std::int32_t i) const;
};
static_assert(sizeof(VtxRecord) == 1259 && alignof(VtxRecord) == 1);
static_assert(offsetof(VtxRecord, text) == 4);
static_assert(offsetof(VtxRecord, num) == 589);
static_assert(offsetof(VtxRecord, dates) == 801);
static_assert(offsetof(VtxRecord, blocks) == 825);
static_assert(offsetof(VtxRecord, tail) == 1159);

// ---- codes

inline constexpr int k_vtx_ok = 0;
inline constexpr int k_vtx_no_index = 1;   // neither index can be opened
inline constexpr int k_vtx_bad_index = 2;  // wrong magic or wrong size
inline constexpr int k_vtx_no_record = 3;
inline constexpr int k_vtx_bad_data = 5;  // no data file, or a short read
inline constexpr int k_vtx_bad_head = 6;  // the data head's id or version
inline constexpr int k_vtx_not_open = 7;
inline constexpr int k_vtx_already_open = 8;

// ---- opening and closing

// Opens the table in a directory; the empty one is the working directory.
// Returns 0, 1, 2, 5, 6 or 8.  An index whose head counts no entries, and a
// second call behind one that failed at the index's size, fail an assertion.
int init_vtx(zxStr directory);

// Closes the table; safe when it is closed.
void vtx_close();

// ---- the table

std::uint32_t vtx_stamp();   // of the data head
std::int32_t vtx_version();  // of the data head, as a number
zxDate vtx_date();           // of the first record
std::int32_t vtx_count();    // entries of the index

// ---- records: 0, 3 (no entry, or no record yet), 5 (short), 7

int vtx_read_by_code(std::int32_t code, VtxRecord& record);
int vtx_read_by_index(std::int32_t index, VtxRecord& record);

// 0 if there is a record, 3, 7.  By code any entry counts, not only the
// first.
int vtx_has_code(std::int32_t code);
int vtx_has_index(std::int32_t index);

// ---- entries

zxStr vtx_name_by_code(std::int32_t code);           // empty if none
zxStr vtx_name_by_index(std::int32_t index);         // empty out of range
std::int32_t vtx_index_of_code(std::int32_t code);   // the first, or -1
std::int32_t vtx_code_by_index(std::int32_t index);  // -1 out of range

// ---- writing

// Writes an index under the D4W name into a directory, which must end in a
// backslash unless it is empty.  A count that does not fit 16 bits fails an
// assertion, behind the creation of the file.
void vtx_write_index(const zxStr& directory, const VtxIndexEntry* entries,
                     std::int32_t count);

// Writes a record over the one of its code (num[0]), or at the end of the
// data file if its entry has none yet; then the index is rewritten too.  A
// code without an entry is fatal (501).
void vtx_put_record(const VtxRecord& record);

// Finds all records of the data file anew and rewrites the index.  Of two
// records with one code the later wins; a code without an entry is passed
// over; a code that is no whole 32-bit number fails an assertion.
void vtx_rebuild_index();

#endif  // R9QVTXDB_H
