// zxbfile.cpp - the file class.
// Tests: tests/zxlib/zxbfile_test.cpp.
#include "zxbfile.h"

#include <climits>

using zxplat::OpenMode;
using zxplat::Whence;

namespace {

constexpr std::int32_t k_max_name = 254;

// The message that reports opening an object that is open already.
std::int32_t already_open_error(OpenMode mode) {
  switch (mode) {
    case OpenMode::read:
      return 1009;
    case OpenMode::read_write:
      return 1005;
    default:
      return 1003;
  }
}

// The stream that "-" stands for; null (an assertion) for reading and
// writing in one.  Descriptor 0 is switched to binary in every case.
zxStream* standard_stream(OpenMode mode) {
  if (!ZX_ASSERT_AT(mode != OpenMode::read_write, "zxfile", 185))
    return nullptr;
  zxplat::set_binary(zxplat::k_stdin_fd);
  return &zx_standard_stream(mode == OpenMode::read ? zxplat::k_stdin_fd
                                                    : zxplat::k_stdout_fd);
}

}  // namespace

constinit zxBFile g_stdin;
constinit zxBFile g_stdout;
constinit zxBFile g_stderr;

zxBFile::~zxBFile() { close(no_detail); }

// ---- opening and closing

bool zxBFile::open_as(const zxStr& file_name, OpenMode mode) {
  if (handle != nullptr) {
    bail_code(already_open_error(mode), file_name);
    return false;
  }
  if (file_name.length() > k_max_name || file_name.is_empty()) return false;
  zxStream* stream = file_name == "-" ? standard_stream(mode)
                                      : zxStream::open(file_name.view(), mode);
  if (stream == nullptr) return false;
  handle = stream;
  name = file_name;
  lines = 0;
  return true;
}

bool zxBFile::open(const zxStr& file_name) {
  return open_as(file_name, OpenMode::read);
}

void zxBFile::open_or_die(const zxStr& file_name, const BailDetail& detail) {
  if (!open(file_name)) bail_code(1002, file_name, detail);
}

bool zxBFile::open_rw(const zxStr& file_name) {
  return open_as(file_name, OpenMode::read_write);
}

bool zxBFile::try_create(const zxStr& file_name) {
  return open_as(file_name, OpenMode::create);
}

void zxBFile::create(const zxStr& file_name, const BailDetail& detail) {
  if (!try_create(file_name)) bail_code(1004, file_name, detail);
}

bool zxBFile::try_create_new(const zxStr& file_name) {
  return open_as(file_name, OpenMode::create_new);
}

void zxBFile::create_new(const zxStr& file_name, const BailDetail& detail) {
  if (!try_create_new(file_name)) bail_code(1004, file_name, detail);
}

bool zxBFile::try_create_private(const zxStr& file_name) {
  return open_as(file_name, OpenMode::create_private);
}

bool zxBFile::is_standard() const {
  return handle == &zx_standard_stream(zxplat::k_stdin_fd) ||
         handle == &zx_standard_stream(zxplat::k_stdout_fd) ||
         handle == &zx_standard_stream(zxplat::k_stderr_fd);
}

bool zxBFile::close() {
  if (handle == nullptr) return true;
  const bool good = is_standard() ? handle->flush() : zxStream::close(handle);
  handle = nullptr;
  name.clear();
  return good;
}

void zxBFile::close(const BailDetail& detail) {
  const zxStr closed_name = name;
  if (!close()) bail_code(1010, closed_name, detail);
}

// ---- reading and writing

bool zxBFile::read(void* buffer, std::int32_t size, std::int32_t* got,
                   const BailDetail& detail) {
  if (got != nullptr) *got = 0;
  if (handle == nullptr) {
    bail_code(1014, name, detail);
    return false;
  }
  if (!ZX_ASSERT(size >= 0)) return false;
  const std::int32_t count =
      static_cast<std::int32_t>(handle->read(buffer, zx_size(size)));
  if (got != nullptr) *got = count;
  if (count == size || (got != nullptr && count != 0)) return true;
  if (handle->error() || !handle->eof()) bail_code(1014, name, detail);
  return false;
}

bool zxBFile::read_all(void* buffer, std::int32_t size,
                       const BailDetail& detail) {
  if (read(buffer, size, nullptr, detail)) return true;
  bail_code(1014, name, detail);
  return false;
}

void zxBFile::write(const void* buffer, std::int32_t size,
                    const BailDetail& detail) {
  if (!ZX_ASSERT(size >= 0)) return;
  if (handle == nullptr || !handle->write(buffer, zx_size(size)))
    bail_code(1016, name, detail);
}

void zxBFile::puts(const zxStr& text) {
  if (handle == nullptr) return bail_code(1024);
  write(text.c_str(), text.length());
  ++lines;
}

void zxBFile::sync(const BailDetail& detail) {
  if (handle == nullptr || !handle->sync()) bail_code(1020, name, detail);
}

// ---- positions

bool zxBFile::seek(std::int32_t position, const BailDetail& detail) {
  if (!ZX_ASSERT(handle != nullptr && position >= 0)) return false;
  if (!handle->seek(position, Whence::start)) {
    bail_code(1012, name, detail);
    return false;
  }
  if (position == 0) lines = 0;
  return true;
}

bool zxBFile::seek_end(const BailDetail& detail) {
  if (handle != nullptr && handle->seek(0, Whence::end)) return true;
  bail_code(1012, name, detail);
  return false;
}

std::int32_t zxBFile::tell(const BailDetail& detail) {
  const std::int64_t at = handle == nullptr ? -1 : handle->tell();
  if (at >= 0 && at <= INT32_MAX) return static_cast<std::int32_t>(at);
  bail_code(1013, name, detail);
  return -1;
}
