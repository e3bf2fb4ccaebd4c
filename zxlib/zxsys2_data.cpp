// zxsys2_data.cpp - reading, writing and comparing whole files.
// Tests: tests/zxlib/zxsys2_test.cpp.

#include <algorithm>
#include <cstring>

#include "zxplat.h"
#include "zxsys2.h"

namespace {

constexpr std::int32_t k_copy_block = 49152;
constexpr std::int32_t k_compare_block = 24576;
constexpr std::int32_t k_read_block = 65536;

// Opens a file, has it written and closes it; true if all of that worked.
template <class Write>
bool write_file(const zxStr& name, bool append, const Write& write) {
  zxBFile file;
  if (!(append ? file.try_append(name) : file.try_create(name))) return false;
  const bool is_written = write(file);
  return file.close() && is_written;
}

bool write_text(zxBFile& file, const zxStr& text) {
  return file.try_write(text.c_str(), text.length());
}

bool write_line(zxBFile& file, const zxStr& line) {
  if (!write_text(file, line)) return false;
  return line.view().starts_with('\n') || file.newline();
}

// Reads up to `size` bytes; the count, 0 at the end.  A failure is fatal even
// if bytes came ahead of it.
std::int32_t read_block(zxBFile& file, char* room, std::int32_t size) {
  std::int32_t got = 0;
  const bool is_read = file.read(room, size, &got);
  if (is_read && file.handle->error()) bail_code(1014, file.name);
  return got;
}

// Writes bytes; true, if the call came back, says that they were taken.
bool write_block(zxBFile& file, const char* bytes, std::int32_t size) {
  file.write(bytes, size);
  return file.is_open() && !file.handle->error();
}

// How much to ask for next: as much again as came, but not more than a byte
// behind what the file seems to have, which shows its end.  A pipe, or a file
// that grows, tells too little, and one with holes too much.
std::int32_t next_block(zxBFile& file, std::int32_t done) {
  const std::int64_t unread = file.handle->size() - done;
  std::int32_t block = std::max(k_read_block, done);
  if (unread > 0 && unread < block)
    block = static_cast<std::int32_t>(unread) + 1;
  return std::min(block, k_most_read - done);
}

// Reads lines, each of which `clean` is called on; those that come out empty
// count if `keeps_empty`.
template <class Clean>
bool read_lines(const zxStr& name, zxQVA<zxStr>& lines, bool keeps_empty,
                const Clean& clean) {
  zxBFile file;
  const bool is_open = file.open(name);
  lines.set_length(0);  // the name may be one of them
  if (!is_open) return false;
  for (zxStr line; file.gets(line);) {
    clean(line);
    if (line.is_empty() && !keeps_empty) continue;
    lines.append(zxStr(line.c_str(), line.length()));  // without spare room
  }
  const bool is_read = !file.handle->error();
  file.close(no_detail);
  return is_read;
}

// A block of a file for comparing and summing up.
class Block {
 public:
  // The next bytes of a file; none at its end.
  std::string_view next(zxBFile& file) {
    return {room, zx_size(read_block(file, room, k_compare_block))};
  }

 private:
  char room[k_compare_block];
};

bool hold_the_same(zxBFile& a, zxBFile& b) {
  Block block_a;
  Block block_b;
  for (;;) {
    const std::string_view bytes = block_a.next(a);
    if (bytes != block_b.next(b)) return false;
    if (bytes.empty()) return !a.handle->error() && !b.handle->error();
  }
}

std::int64_t time_of(const zxStr& name) {
  return zxplat::status_of(name.view()).modified;
}

// True if the bytes came and were taken.
bool copy_block(zxBFile& in, zxBFile& out, char* room, std::int32_t size) {
  return in.read_all(room, size) && write_block(out, room, size);
}

// More bytes than a 31-bit size counts must be those of a file that has them.
bool is_endless(zxBFile& in, std::int64_t copied) {
  return copied > INT32_MAX && copied > in.handle->size();
}

void copy_to_end(zxBFile& in, zxBFile& out, char* room) {
  std::int64_t copied = 0;
  while (const std::int32_t got = read_block(in, room, k_copy_block)) {
    copied += got;
    if (is_endless(in, copied)) return bail_code(1014, in.name);
    if (!write_block(out, room, got)) return;
  }
}

}  // namespace

// ---- writing

bool str2file(const zxStr& name, const zxStr& text, bool append) {
  return write_file(name, append,
                    [&](zxBFile& file) { return write_text(file, text); });
}

void str2file_or_die(const zxStr& name, const zxStr& text, bool append) {
  ZX_ASSERT(str2file(name, text, append));
}

bool lines2file(const zxStr& name, const zxQVA<zxStr>& lines, bool append) {
  return write_file(name, append, [&](zxBFile& file) {
    return std::all_of(lines.begin(), lines.end(), [&](const zxStr& line) {
      return write_line(file, line);
    });
  });
}

void lines2file_or_die(const zxStr& name, const zxQVA<zxStr>& lines,
                       bool append) {
  ZX_ASSERT(lines2file(name, lines, append));
}

// ---- reading

bool file2str(const zxStr& name, zxStr& text) {
  zxBFile file;
  const bool is_open = file.open(name);
  text.clear();  // the name may be the same string
  if (!is_open) return false;
  std::int32_t done = 0;
  std::int32_t got = 0;
  std::int32_t block = 0;
  do {
    block = next_block(file, done);
    char* const room = text.buffer(done + block);
    got = read_block(file, room + done, block);
    done += got;
  } while (got == block && done < k_most_read);
  const bool is_read = !file.handle->error();
  text.set_length(is_read ? done : 0);
  file.close(no_detail);
  return is_read;
}

bool file2lines(const zxStr& name, zxQVA<zxStr>& lines) {
  return read_lines(name, lines, true, strip_line_end);
}

bool file2conflines(const zxStr& name, zxQVA<zxStr>& lines,
                    const char* comment) {
  const std::string_view marks = comment != nullptr ? comment : "#";
  return read_lines(name, lines, false, [&](zxStr& line) {
    const std::size_t end = line.view().find_first_of(marks);
    if (end != std::string_view::npos) line.set_length(zx_count(end));
    trim(line);
  });
}

// ---- copying

void copy_stream(zxBFile& in, zxBFile& out, std::int32_t size) {
  if (!ZX_ASSERT(size >= -1)) return;
  zxStr block;
  char* const room = block.buffer(k_copy_block);
  if (size == -1) return copy_to_end(in, out, room);
  for (std::int32_t left = size; left > 0; left -= k_copy_block)
    if (!copy_block(in, out, room, std::min(left, k_copy_block))) return;
}

void append_file(const zxStr& from, const zxStr& to) {
  if (!ZX_ASSERT(!zxplat::same_file(from.view(), to.view()))) return;
  zxBFile in;
  in.open_or_die(from);
  if (!in.is_open()) return;
  zxBFile out;
  out.append(to);
  if (!out.is_open()) return;
  copy_stream(in, out);
  in.close(no_detail);
  out.close(no_detail);
}

// ---- comparing

std::int32_t compare_files(const zxStr& a, const zxStr& b) {
  zxBFile file_a;
  zxBFile file_b;
  if (!file_a.open(a) || !file_b.open(b)) return k_files_unlike;
  if (file_a.handle->size() != file_b.handle->size()) return k_files_unlike;
  if (!hold_the_same(file_a, file_b)) return k_files_differ;
  return time_of(a) == time_of(b) ? k_files_same : k_files_same_data;
}

bool same_files(const zxStr& a, const zxStr& b) {
  return compare_files(a, b) < k_files_differ;
}

std::uint16_t file_crc(const zxStr& name) {
  std::uint16_t crc = crc16(nullptr, 0);
  zxBFile file;
  file.open_or_die(name);
  if (!file.is_open()) return crc;
  Block block;
  for (;;) {
    const std::string_view bytes = block.next(file);
    if (bytes.empty()) break;
    crc = crc16_add(crc, bytes.data(), bytes.size());
  }
  file.close(no_detail);
  return crc;
}
