// zxisfile.cpp - questions about one file.
// Tests: tests/zxlib/zxisfile_test.cpp.
#include "zxisfile.h"

#include <algorithm>
#include <limits>
#include <string_view>

#include "zxbfile.h"
#include "zxfile.h"
#include "zxnextf.h"
#include "zxplat.h"

namespace {

using zxplat::FileStatus;
using zxplat::NameKind;
using zxplat::OpenMode;

// How much of a file is looked at to tell binary from text.
constexpr std::size_t k_probe_size = 128;

// What the two bytes of a line end count against one odd byte.
constexpr std::int32_t k_line_end_weight = 20;
constexpr std::int32_t k_odd_weight = 5;

enum class Content { unknown, binary, text };

std::int32_t saturated(std::int64_t value) {
  using Limits = std::numeric_limits<std::int32_t>;
  return static_cast<std::int32_t>(
      std::clamp<std::int64_t>(value, Limits::min(), Limits::max()));
}

bool ends_in_backslash(const zxStr& name) {
  return name.view().ends_with('\\');
}

// The first bytes of a file; none if it is empty or cannot be read.
class Probe {
 public:
  explicit Probe(const zxStr& name) {
    zxStream* stream = zxStream::open(name.view(), OpenMode::read);
    if (stream == nullptr) return;
    size = stream->read(room, sizeof room);
    zxStream::close(stream);
  }

  std::string_view bytes() const { return {room, size}; }

 private:
  char room[k_probe_size];
  std::size_t size = 0;
};

// A byte that does not belong into text.  Bytes from 128 on are negative
// numbers here, so of those only the letters of code page 862 are no odd
// ones.
bool is_odd(char byte) {
  if (zx_is(byte, k_class_space | k_class_hebdos)) return false;
  return static_cast<signed char>(byte) < 32 || byte == 127;
}

Content content_of(std::string_view bytes) {
  if (bytes.empty()) return Content::unknown;
  std::int32_t odd = 0;
  std::int32_t plain = 0;
  while (!bytes.empty()) {
    const bool is_line_end = bytes.starts_with("\r\n");
    if (is_line_end)
      plain += k_line_end_weight;
    else
      ++(is_odd(bytes.front()) ? odd : plain);
    bytes.remove_prefix(is_line_end ? 2 : 1);
  }
  return plain < odd * k_odd_weight ? Content::binary : Content::text;
}

bool opens(const zxStr& name, OpenMode mode) {
  zxStream* stream = zxStream::open(name.view(), mode);
  return stream != nullptr && zxStream::close(stream);
}

// A file is made and deleted again.
bool takes_files(const zxStr& directory) {
  zxBFile file;
  zxStr name;
  const bool is_created =
      create_unique(file, &zxBFile::try_create_private, directory, nullptr,
                    name) == zxUnique::created;
  if (!is_created) return false;
  const bool is_closed = file.close();
  return zxplat::files.remove(name.view()) && is_closed;
}

// True for a root that the system does not know as a folder, such as that of
// a shared folder, which has to have its separator.
bool is_volume_root(zxStr& name) {
  if (name.view().starts_with("\\\\")) name.append('\\');
  return zxplat::is_volume(name.view());
}

bool holds(char test, const zxStr& name, const FileStatus& status) {
  switch (test) {
    case 'd':
      return status.kind == NameKind::directory;
    case 'f':
      return status.kind == NameKind::file;
    case 'c':
      return status.kind == NameKind::device;
    case 'r':
      return opens(name, OpenMode::read);
    case 'w':
      return status.kind == NameKind::directory
                 ? takes_files(name)
                 : opens(name, OpenMode::read_write);
    case 'x':
      return status.is_executable;
    case 's':
      return status.size != 0;
    case 'z':
      return status.size == 0;
    case 'B':
      return content_of(Probe(name).bytes()) == Content::binary;
    case 'T':
      return content_of(Probe(name).bytes()) == Content::text;
    default:
      ZX_ASSERT_AT(false, "zxisfile", 134);
      return false;
  }
}

bool passes(const char* tests, const zxStr& name, const FileStatus& status) {
  if (tests == nullptr) return true;
  const std::string_view letters(tests);
  return std::all_of(letters.begin(), letters.end(),
                     [&](char test) { return holds(test, name, status); });
}

}  // namespace

bool isfile(const zxStr& name, const char* tests, std::int32_t* size,
            std::int32_t* time) {
  if (name.is_empty()) return false;
  const bool must_be_folder = ends_in_backslash(name);
  zxStr found = name;
  strip_slash(found);
  FileStatus status = zxplat::status_of(found.view());
  if (status.kind == NameKind::other) return false;
  if (status.kind == NameKind::missing) {
    if (!is_volume_root(found)) return false;
    status.kind = NameKind::directory;
  } else {
    if (size != nullptr) *size = saturated(status.size);
    if (time != nullptr) *time = saturated(status.modified);
  }
  if (must_be_folder && status.kind != NameKind::directory) return false;
  return passes(tests, found, status);
}

std::int32_t file_size(const zxStr& name) {
  std::int32_t size = 0;
  isfile(name, nullptr, &size, nullptr);
  return size;
}

std::int32_t file_time(const zxStr& name) {
  std::int32_t time = 0;
  isfile(name, nullptr, nullptr, &time);
  return time;
}

bool any_file(const zxStr& pattern, const char* tests) {
  zxQVA<zxStr> list;
  list.append(pattern);
  for (zxStr name; next_file(list, name);)
    if (isfile(name, tests)) return true;
  return false;
}

bool all_files(const zxStr& pattern, const char* tests) {
  zxQVA<zxStr> list;
  list.append(pattern);
  for (zxStr name; next_file(list, name);)
    if (!isfile(name, tests)) return false;
  return true;
}
