// vtxtable.h - a table of securities in memory, as its two files hold it.
//
// The parser (vtxtext.h) fills one, the writer (vtxwrite.h) puts it to disk.
// Each entry's offset is final: record i lies at vtx_record_offset(i).
#ifndef VTXTABLE_H
#define VTXTABLE_H

#include <climits>
#include <cstdint>

#include "r9qvtxdb.h"
#include "zxqva.h"

struct VtxTable {
  // The index counts its entries in 16 bits.
  static constexpr std::int32_t k_max_entries = INT16_MAX;

  VtxDataHead head = {};
  zxQVA<VtxIndexEntry> entries;
  zxQVA<VtxRecord> records;  // in the order of the data file
};

// Where record i of a data file starts.
constexpr std::int32_t vtx_record_offset(std::int32_t i) {
  return static_cast<std::int32_t>(sizeof(VtxDataHead)) +
         i * static_cast<std::int32_t>(sizeof(VtxRecord));
}
static_assert(INT32_MAX / sizeof(VtxRecord) > VtxTable::k_max_entries,
              "every offset fits 31 bits");

#endif  // VTXTABLE_H
