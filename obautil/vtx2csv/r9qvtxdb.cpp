// r9qvtxdb.cpp - the lookup database.
// Tests: tests/obautil/r9qvtxdb_test.cpp.
#include "r9qvtxdb.h"

#include <climits>
#include <cstring>

#include "zxbfile.h"

namespace {

constexpr std::int32_t k_oldest_version = 101;
constexpr char k_data_id[] = "R9QVTX";
// What stands behind the version in the head of a closed table.
constexpr std::uint8_t k_closed_mark = 26;

constexpr std::int32_t k_error_not_open = 500;
constexpr std::int32_t k_error_unknown_code = 501;

struct State {
  VtxIndexEntry* entries = nullptr;
  std::int32_t entry_count = 0;
  zxBFile data_file;
  VtxDataHead data_head = {};
  zxStr directory;
  zxDate table_date;
  bool is_open = false;
};
constinit State table;

// True if the table is open; otherwise the operation is fatal.
bool check_open() {
  if (!table.is_open) bail_code(k_error_not_open);
  return table.is_open;
}

bool is_index(std::int32_t i) { return i >= 0 && i < table.entry_count; }

// The NUL-terminated text at the start of some bytes, or all of them.
std::string_view text_within(const char* bytes, std::size_t size) {
  const void* end = std::memchr(bytes, '\0', size);
  return {bytes,
          end ? static_cast<std::size_t>(static_cast<const char*>(end) - bytes)
              : size};
}

// The text of the data head from `offset` on; a missing NUL lets it run on
// to the head's end.
std::string_view head_text(std::size_t offset) {
  const auto* bytes = reinterpret_cast<const char*>(&table.data_head);
  return text_within(bytes + offset, sizeof(VtxDataHead) - offset);
}

std::int32_t head_version() {
  return zxStr(head_text(offsetof(VtxDataHead, version))).to_int();
}

bool head_is_good() {
  std::string_view id = head_text(0);
  while (!id.empty() && zx_is_digit(id.back())) id.remove_suffix(1);
  return id == k_data_id && head_version() >= k_oldest_version;
}

// ---- opening

bool open_index(zxBFile& index, const zxStr& directory) {
  return index.open(directory + k_d4w_index_name) ||
         index.open(directory + k_r9q_index_name);
}

bool open_data(const zxStr& directory) {
  return table.data_file.open_rw(directory + k_d4w_data_name) ||
         table.data_file.open_rw(directory + k_r9q_data_name);
}

// Reads the entries behind the head, which must be exactly `count`.  Bytes
// behind them that make up less than an entry do not count.
int read_entries(zxBFile& index, std::int32_t count) {
  VtxIndexEntry entry;
  while (index.read(&entry, sizeof entry)) {
    if (table.entry_count >= count) return k_vtx_bad_index;
    table.entries[table.entry_count++] = entry;
  }
  return table.entry_count == count ? k_vtx_ok : k_vtx_bad_index;
}

int read_index(const zxStr& directory) {
  zxBFile index;
  if (!open_index(index, directory)) return k_vtx_no_index;
  VtxIndexHead head = {0, 0};
  if (!index.read(&head, sizeof head)) head.magic = 0;
  if (head.magic != VtxIndexHead::k_magic) return k_vtx_bad_index;
  if (!ZX_ASSERT(head.count >= 1)) return k_vtx_bad_index;
  const std::size_t size = zx_size(head.count) * sizeof(VtxIndexEntry);
  table.entries = static_cast<VtxIndexEntry*>(zx_realloc(table.entries, size));
  return read_entries(index, head.count);
}

int read_data_head(const zxStr& directory) {
  if (!open_data(directory)) return k_vtx_bad_data;
  if (!table.data_file.read(&table.data_head, sizeof table.data_head))
    return k_vtx_bad_data;
  if (!head_is_good()) return k_vtx_bad_head;
  VtxRecord first;
  if (!table.data_file.read(&first, sizeof first)) return k_vtx_bad_data;
  table.table_date = first.date;
  table.directory = directory;
  return k_vtx_ok;
}

// ---- records

int read_at(std::int32_t offset, VtxRecord& record) {
  if (offset == VtxIndexEntry::k_no_record) return k_vtx_no_record;
  if (!table.data_file.seek(offset)) return k_vtx_bad_data;
  return table.data_file.read(&record, sizeof record) ? k_vtx_ok
                                                      : k_vtx_bad_data;
}

// The first entry whose code equals a number, or null.
VtxIndexEntry* find_entry(double code) {
  for (std::int32_t i = 0; i < table.entry_count; ++i)
    if (table.entries[i].code == code) return &table.entries[i];
  return nullptr;
}

void write_own_index() {
  vtx_write_index(table.directory, table.entries, table.entry_count);
}

// The code of a record as a number of 32 bits.
bool whole_code(const VtxRecord& record, std::int32_t& code) {
  const double value = record.num[0].to_double();
  if (!ZX_ASSERT(value >= INT32_MIN && value <= INT32_MAX)) return false;
  code = static_cast<std::int32_t>(value);
  return ZX_ASSERT(code == value);
}

}  // namespace

VtxRecord::VtxRecord() {
  date = zxDate();
  for (VtxDate& field : dates) field = zxDate();
  for (auto& block : blocks) std::memset(block, 0, 2 * sizeof(HvlDecimal));
}

std::string_view VtxRecord::text_field(std::int32_t i) const {
  if (!ZX_ASSERT(i >= 0 && i < k_texts)) return {};
  const std::size_t start =
      offsetof(VtxRecord, text) + zx_size(i) * k_text_size;
  const auto* bytes = reinterpret_cast<const char*>(this);
  return text_within(bytes + start, sizeof(VtxRecord) - start);
}

int init_vtx(zxStr directory) {
  if (table.is_open) return k_vtx_already_open;
  if (!ZX_ASSERT(table.entry_count == 0)) return k_vtx_bad_index;
  const std::int32_t n = directory.length();
  if (n > 0 && directory[n - 1] != '\\') directory += '\\';
  const int code = read_index(directory);
  if (code != k_vtx_ok) return code;
  table.is_open = true;
  return read_data_head(directory);
}

void vtx_close() {
  if (table.entries != nullptr) zx_realloc(table.entries, 0);
  table.entries = nullptr;
  table.entry_count = 0;
  table.directory.clear();
  table.is_open = false;
  table.data_file.close(no_detail);
  table.table_date = zxDate();
  std::memset(&table.data_head, 0, offsetof(VtxDataHead, end));
  table.data_head.end = k_closed_mark;
  table.data_head.stamp = 0;
}

std::uint32_t vtx_stamp() {
  if (!check_open()) return 0;
  return table.data_head.stamp;
}

std::int32_t vtx_version() { return check_open() ? head_version() : 0; }

zxDate vtx_date() { return check_open() ? table.table_date : zxDate(); }

std::int32_t vtx_count() { return check_open() ? table.entry_count : 0; }

int vtx_read_by_index(std::int32_t index, VtxRecord& record) {
  if (!table.is_open) return k_vtx_not_open;
  if (!is_index(index)) return k_vtx_no_record;
  return read_at(table.entries[index].offset, record);
}

int vtx_read_by_code(std::int32_t code, VtxRecord& record) {
  if (!table.is_open) return k_vtx_not_open;
  const VtxIndexEntry* entry = find_entry(code);
  if (entry == nullptr) return k_vtx_no_record;
  return read_at(entry->offset, record);
}

int vtx_has_code(std::int32_t code) {
  if (!table.is_open) return k_vtx_not_open;
  for (std::int32_t i = 0; i < table.entry_count; ++i) {
    const VtxIndexEntry& entry = table.entries[i];
    if (entry.code == code && entry.offset > VtxIndexEntry::k_no_record)
      return k_vtx_ok;
  }
  return k_vtx_no_record;
}

int vtx_has_index(std::int32_t index) {
  if (!table.is_open) return k_vtx_not_open;
  const bool has_record = is_index(index) && table.entries[index].offset >
                                                 VtxIndexEntry::k_no_record;
  return has_record ? k_vtx_ok : k_vtx_no_record;
}

zxStr vtx_name_by_index(std::int32_t index) {
  if (!check_open() || !is_index(index)) return {};
  const VtxIndexEntry& entry = table.entries[index];
  return zxStr(text_within(entry.name, sizeof entry.name));
}

zxStr vtx_name_by_code(std::int32_t code) {
  return vtx_name_by_index(vtx_index_of_code(code));
}

std::int32_t vtx_index_of_code(std::int32_t code) {
  const VtxIndexEntry* entry = check_open() ? find_entry(code) : nullptr;
  return entry ? static_cast<std::int32_t>(entry - table.entries) : -1;
}

std::int32_t vtx_code_by_index(std::int32_t index) {
  if (!check_open() || !is_index(index)) return -1;
  return table.entries[index].code;
}

void vtx_write_index(const zxStr& directory, const VtxIndexEntry* entries,
                     std::int32_t count) {
  zxBFile index;
  index.create(directory + k_d4w_index_name);
  const bool fits = count >= INT16_MIN && count <= INT16_MAX;
  if (!ZX_ASSERT(fits) || !index.is_open()) return;
  const VtxIndexHead head = {VtxIndexHead::k_magic,
                             static_cast<std::int16_t>(count)};
  index.write(&head, sizeof head);
  for (std::int32_t i = 0; i < count; ++i)
    index.write(&entries[i], sizeof entries[i]);
}

void vtx_put_record(const VtxRecord& record) {
  if (!check_open()) return;
  VtxIndexEntry* entry = find_entry(record.num[0].to_double());
  if (entry == nullptr) return bail_code(k_error_unknown_code);
  if (entry->offset != VtxIndexEntry::k_no_record) {
    if (!table.data_file.seek(entry->offset)) return;
  } else {
    if (!table.data_file.seek_end()) return;
    const std::int32_t position = table.data_file.tell();
    if (position < 0) return;
    entry->offset = position;
    write_own_index();
  }
  table.data_file.write(&record, sizeof record);
}

void vtx_rebuild_index() {
  if (!check_open()) return;
  if (!table.data_file.seek(0) ||
      !table.data_file.read_all(&table.data_head, sizeof table.data_head))
    return;
  std::int32_t position = table.data_file.tell();
  for (std::int32_t i = 0; i < table.entry_count; ++i)
    table.entries[i].offset = VtxIndexEntry::k_no_record;
  VtxRecord record;
  while (table.data_file.read(&record, sizeof record)) {
    std::int32_t code = 0;
    if (!whole_code(record, code)) return;
    const std::int32_t i = vtx_index_of_code(code);
    if (i >= 0) table.entries[i].offset = position;
    position = table.data_file.tell();
  }
  write_own_index();
}
