// zxbfile.cpp - the file class; its lines of text are in zxbfile_text.cpp.
// Tests: tests/zxlib/zxbfile_test.cpp.
#include "zxbfile.h"

#include <climits>

using zxplat::OpenMode;
using zxplat::Whence;

namespace {

constexpr std::int32_t k_max_name = 254;
constexpr std::int32_t k_bulk_buffer = 24576;

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

void zxBFile::open_rw_or_die(const zxStr& file_name, const BailDetail& detail) {
  if (!open_rw(file_name)) bail_code(1006, file_name, detail);
}

bool zxBFile::try_append(const zxStr& file_name) {
  return open_as(file_name, OpenMode::append);
}

void zxBFile::append(const zxStr& file_name, const BailDetail& detail) {
  if (!try_append(file_name)) bail_code(1004, file_name, detail);
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

void zxBFile::attach(const zxStr& stream_name, zxStream& stream) {
  const zxplat::Fd descriptor = stream.descriptor();
  if (!zxplat::has_stream(descriptor)) {
    open_rw("nul");
    return;
  }
  const bool is_binary =
      zxplat::files.set_mode(descriptor, zxplat::StreamMode::binary);
  if (!ZX_ASSERT_AT(is_binary, "zxmainf", 44)) return;
  if (descriptor == zxplat::k_stderr_fd || zxplat::is_terminal(descriptor))
    stream.set_unbuffered();
  handle = &stream;
  name = stream_name;
  lines = 0;
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

zxStr zxBFile::get_name() const {
  if (handle != nullptr) return name;
  bail_code(1007);
  return zxStr();
}

// ---- buffering

bool zxBFile::set_buffer(std::int32_t size) {
  return handle != nullptr && size > 0 && handle->set_buffer(zx_size(size));
}

void zxBFile::fastio() {
  if (!set_buffer(k_bulk_buffer)) bail_code(1011, name);
}

// ---- reading and writing

// The part of read() and try_read() behind their checks.
bool zxBFile::read_some(void* buffer, std::int32_t size, std::int32_t* got) {
  const std::int32_t count =
      static_cast<std::int32_t>(handle->read(buffer, zx_size(size)));
  if (got != nullptr) *got = count;
  return count == size || (got != nullptr && count != 0);
}

bool zxBFile::read(void* buffer, std::int32_t size, std::int32_t* got,
                   const BailDetail& detail) {
  if (got != nullptr) *got = 0;
  if (handle == nullptr) {
    bail_code(1014, name, detail);
    return false;
  }
  if (!ZX_ASSERT(size >= 0)) return false;
  if (read_some(buffer, size, got)) return true;
  if (handle->error() || !handle->eof()) bail_code(1014, name, detail);
  return false;
}

bool zxBFile::try_read(void* buffer, std::int32_t size, std::int32_t* got) {
  if (got != nullptr) *got = 0;
  return ZX_ASSERT(size >= 0) && handle != nullptr &&
         read_some(buffer, size, got);
}

bool zxBFile::read_all(void* buffer, std::size_t size,
                       const BailDetail& detail) {
  if (handle != nullptr && handle->read(buffer, size) == size) return true;
  bail_code(1014, name, detail);
  return false;
}

bool zxBFile::read_all(void* buffer, std::int32_t size,
                       const BailDetail& detail) {
  return ZX_ASSERT(size >= 0) && read_all(buffer, zx_size(size), detail);
}

bool zxBFile::read_str(zxStr& text, std::int32_t size) {
  if (!ZX_ASSERT(size >= 0)) return false;
  if (text.representation()->refs >= 2) text.clear();  // nothing to copy
  char* const room = text.buffer(size);
  std::int32_t got = 0;
  const bool is_read = room != nullptr && read(room, size, &got);
  text.set_length(got);
  return is_read;
}

bool zxBFile::read_str_all(zxStr& text, std::int32_t size) {
  return ZX_ASSERT_AT(read_str(text, size), "zxbfile", 222);
}

void zxBFile::write(const void* buffer, std::size_t size,
                    const BailDetail& detail) {
  if (handle == nullptr || !handle->write(buffer, size))
    bail_code(1016, name, detail);
}

void zxBFile::write(const void* buffer, std::int32_t size,
                    const BailDetail& detail) {
  if (ZX_ASSERT(size >= 0)) write(buffer, zx_size(size), detail);
}

bool zxBFile::try_write(const void* buffer, std::int32_t size) {
  if (!ZX_ASSERT(size >= 0)) return false;
  if (handle != nullptr) return handle->write(buffer, zx_size(size));
  bail_code(1016);
  return false;
}

void zxBFile::flush(const BailDetail& detail) {
  if (handle == nullptr || !handle->flush()) bail_code(1020, name, detail);
}

void zxBFile::sync(const BailDetail& detail) {
  if (handle == nullptr || !handle->sync()) bail_code(1020, name, detail);
}

// ---- positions

bool zxBFile::seek_as_told(std::int32_t position) {
  if (!handle->seek(position, Whence::start)) return false;
  if (position == 0) lines = 0;
  return true;
}

bool zxBFile::seek(std::int32_t position, const BailDetail& detail) {
  if (!ZX_ASSERT(handle != nullptr && position >= 0)) return false;
  if (seek_as_told(position)) return true;
  bail_code(1012, name, detail);
  return false;
}

bool zxBFile::try_seek(std::int32_t position) {
  return ZX_ASSERT(handle != nullptr && position >= 0) &&
         seek_as_told(position);
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

// ---- the file's size

std::int32_t zxBFile::length() const {
  if (handle == nullptr) {
    bail_code(1018);
    return -1;
  }
  const std::int64_t size = handle->size();
  return size > INT32_MAX ? -1 : static_cast<std::int32_t>(size);
}

std::int32_t zxBFile::length(const BailDetail& detail) const {
  const std::int32_t size = handle == nullptr ? -1 : length();
  if (size < 0) bail_code(1019, name, detail);
  return size;
}

void zxBFile::chsize(std::int32_t size, const BailDetail& detail) {
  if (handle == nullptr || !handle->set_size(size))
    bail_code(1023, name, detail);
}

// ---- locks

// Nothing that was read before may be taken for what is there behind a lock.
bool zxBFile::prepare_lock(std::int32_t position, std::int32_t error,
                           const BailDetail& detail) {
  if (handle == nullptr || !handle->flush()) {
    bail_code(error, name, detail);
    return false;
  }
  handle->drop_unread();
  return seek(position, detail);
}

bool zxBFile::lock(std::int32_t position, std::int32_t size,
                   const BailDetail& detail) {
  if (!ZX_ASSERT(size >= 0) || !prepare_lock(position, 1033, detail))
    return false;
  if (size == 0 || handle->lock(position, size)) return true;
  if (zxplat::last_error() != zxplat::k_err_lock) bail_code(1021, name, detail);
  return false;
}

void zxBFile::unlock(std::int32_t position, std::int32_t size,
                     const BailDetail& detail) {
  if (!ZX_ASSERT(size >= 0) || !prepare_lock(position, 1092, detail)) return;
  if (size > 0 && !handle->unlock(position, size))
    bail_code(1022, name, detail);
}
