// table_bytes.h - the files of a table for tests, made byte by byte with no
// help from the code under test.
#ifndef TABLE_BYTES_H
#define TABLE_BYTES_H

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace table_bytes {

inline constexpr std::size_t k_head_size = 55;
inline constexpr std::size_t k_record_size = 1259;
inline constexpr std::uint32_t k_magic = 4321501;

// Where record i lies if all records follow the head.
constexpr std::int32_t offset_of(int i) { return 55 + 1259 * i; }

// A number of so many bytes, the lowest first.
inline std::string le(std::int64_t number, int bytes) {
  std::string text;
  for (int i = 0; i < bytes; ++i, number >>= 8)
    text += static_cast<char>(number & 255);
  return text;
}

// Puts a text over the bytes at `at`.
inline void put(std::string& bytes, std::size_t at, std::string_view text) {
  bytes.replace(at, text.size(), text);
}

struct Entry {
  std::string name;
  std::int32_t code;
  std::int32_t offset;
};

inline std::string entry_bytes(const Entry& entry) {
  std::string name = entry.name;
  name.resize(16);
  return name + le(entry.code, 4) + le(entry.offset, 4);
}

inline std::string index_head(std::int64_t count,
                              std::uint32_t magic = k_magic) {
  return le(magic, 4) + le(count, 2);
}

inline std::string index_bytes(const std::vector<Entry>& entries) {
  std::string bytes = index_head(static_cast<std::int64_t>(entries.size()));
  for (const Entry& entry : entries) bytes += entry_bytes(entry);
  return bytes;
}

// The head of the data file: a text from byte 0 on, and the stamp unless the
// text reaches over it.
inline std::string data_head(std::string_view text = "R9QVTX101",
                             std::uint32_t stamp = 0) {
  std::string bytes(k_head_size, '\0');
  put(bytes, 11, le(stamp, 4));
  put(bytes, 0, text);
  return bytes;
}

// A record of zeros, to be filled field by field.
struct Record {
  std::string bytes = std::string(k_record_size, '\0');

  Record& date(int days) { return at(0, le(days, 2)); }
  Record& type(int number) { return at(2, le(number, 2)); }
  Record& text(int i, std::string_view content) {
    return at(4 + 65 * i, content);
  }
  // A decimal by its word.
  Record& num(int i, std::int32_t word) { return at(589 + 4 * i, le(word, 4)); }
  Record& day(int i, int days) { return at(801 + 2 * i, le(days, 2)); }
  Record& at(int offset, std::string_view content) {
    put(bytes, static_cast<std::size_t>(offset), content);
    return *this;
  }
};

// A record of a security: its code in the integer form and a name, which
// makes it a live one.
inline Record security(std::int32_t code, std::string_view name = "x") {
  return Record().num(0, code * 2).text(1, name);
}

inline std::string data_bytes(const std::vector<Record>& records,
                              const std::string& head = data_head()) {
  std::string bytes = head;
  for (const Record& record : records) bytes += record.bytes;
  return bytes;
}

}  // namespace table_bytes

#endif  // TABLE_BYTES_H
