// zxfile.cpp - the buffered stream.
// Tests: tests/zxlib/zxfile_test.cpp.
#include "zxfile.h"

#include <cstring>
#include <new>

#include "zxatsys.h"
#include "zxmisc.h"

namespace {

constexpr std::size_t k_buffer_size = 65536;
// What is read at once behind a seek; it doubles up to the whole buffer.
constexpr std::size_t k_first_read_ahead = 4096;

constinit zxStream standard_streams[] = {zxStream(zxplat::k_stdin_fd),
                                         zxStream(zxplat::k_stdout_fd),
                                         zxStream(zxplat::k_stderr_fd)};

// The streams that open() made, the newest first.
constinit zxStream* newest_stream = nullptr;

}  // namespace

zxStream& zx_standard_stream(zxplat::Fd descriptor) {
  return standard_streams[descriptor];
}

zxStream* zxStream::open(std::string_view name, zxplat::OpenMode mode) {
  const zxplat::Fd fd = zxplat::files.open(name, mode);
  if (fd == zxplat::k_no_fd) return nullptr;
  auto* stream = ::new (zx_realloc(nullptr, sizeof(zxStream))) zxStream(fd);
  stream->appends = mode == zxplat::OpenMode::append;
  if (!stream->appends) stream->position = 0;
  stream->join_open_streams();
  return stream;
}

void zxStream::join_open_streams() {
  older = newest_stream;
  if (older != nullptr) older->newer = this;
  newest_stream = this;
}

void zxStream::leave_open_streams() {
  (newer != nullptr ? newer->older : newest_stream) = older;
  if (older != nullptr) older->newer = newer;
}

// True if the descriptor was given back before, or is now.
bool zxStream::close_descriptor() {
  const zxplat::Fd old = fd;
  fd = zxplat::k_no_fd;
  return old == zxplat::k_no_fd || zxplat::files.close(old);
}

void zxStream::flush_all() {
  for (zxStream* stream = newest_stream; stream != nullptr;
       stream = stream->older)
    stream->flush();
}

void zxStream::close_all() {
  for (zxStream* stream = newest_stream; stream != nullptr;
       stream = stream->older) {
    stream->flush();
    stream->close_descriptor();
    stream->state = State::idle;
    stream->next = stream->end = 0;
    stream->position = -1;
    stream->write_failed = false;
  }
}

bool zxStream::close(zxStream* stream) {
  const bool written = stream->flush() && !stream->write_failed;
  const bool closed = stream->close_descriptor();
  stream->leave_open_streams();
  if (stream->buffer != nullptr) zx_realloc(stream->buffer, 0);
  stream->~zxStream();
  zx_realloc(stream, 0);
  return written && closed;
}

void zxStream::take_buffer() {
  next = end = 0;
  if (buffer == nullptr)
    buffer = static_cast<char*>(zx_realloc(nullptr, k_buffer_size));
}

// ---- reading

bool zxStream::begin_reading() {
  if (state == State::reading) return true;
  if (!flush()) return false;
  state = State::reading;
  take_buffer();
  return true;
}

// One read of the system, into the caller's memory or, the buffer being
// empty, into that; the count, 0 at the end and on failure.
std::size_t zxStream::read_from_system(char* out, std::size_t size) {
  const std::int64_t got = zxplat::files.read(fd, out, size);
  next = end = 0;
  if (got < 0) read_failed = true;
  if (got == 0) at_end = true;
  if (got <= 0) return 0;
  if (position >= 0) position += got;
  return static_cast<std::size_t>(got);
}

void zxStream::fill() {
  if (read_ahead < k_first_read_ahead) read_ahead = k_first_read_ahead;
  end = read_from_system(buffer, read_ahead);
  if (read_ahead < k_buffer_size) read_ahead *= 2;
}

// Hands out what is in the buffer, up to `size` bytes; the count.
std::size_t zxStream::read_from_buffer(char* out, std::size_t size) {
  const std::size_t unread = end - next;
  const std::size_t count = unread < size ? unread : size;
  if (count > 0) std::memcpy(out, buffer + next, count);
  next += count;
  return count;
}

std::size_t zxStream::read(void* out, std::size_t size) {
  if (!begin_reading()) return 0;
  char* to = static_cast<char*>(out);
  std::size_t done = read_from_buffer(to, size);
  while (done < size) {
    const std::size_t left = size - done;
    std::size_t count = 0;
    if (left >= k_buffer_size) {
      count = read_from_system(to + done, left);
    } else {
      fill();
      count = read_from_buffer(to + done, left);
    }
    if (count == 0) break;
    done += count;
  }
  return done;
}

// Moves the descriptor back over the bytes that were read ahead.
bool zxStream::give_back_unread() {
  if (next == end) return true;
  const std::int64_t unread = static_cast<std::int64_t>(end - next);
  const std::int64_t at =
      zxplat::files.seek(fd, -unread, zxplat::Whence::current);
  if (at < 0) {
    read_failed = true;
    return false;
  }
  position = at;
  next = end = 0;
  return true;
}

// ---- writing

bool zxStream::begin_writing() {
  if (state == State::writing) return true;
  if (state == State::reading && !give_back_unread()) {
    write_failed = true;  // the caller's bytes have no place to go
    return false;
  }
  state = State::writing;
  take_buffer();
  return true;
}

bool zxStream::write_down(const char* bytes, std::size_t size) {
  while (size > 0) {
    const std::int64_t done = zxplat::files.write(fd, bytes, size);
    if (done <= 0) {
      write_failed = true;
      return false;
    }
    bytes += done;
    size -= static_cast<std::size_t>(done);
    if (position >= 0) position += done;
  }
  if (appends) position = -1;  // the system chose the place
  return true;
}

bool zxStream::write(const void* bytes, std::size_t size) {
  if (!begin_writing()) return false;
  const char* from = static_cast<const char*>(bytes);
  while (next + size >= k_buffer_size) {
    const std::size_t piece = k_buffer_size - next;
    std::memcpy(buffer + next, from, piece);
    next = k_buffer_size;
    from += piece;
    size -= piece;
    if (!flush()) return false;
  }
  if (size > 0) std::memcpy(buffer + next, from, size);
  next += size;
  return !unbuffered || flush();
}

// What could not be written is dropped: a repeated flush must not write
// bytes twice.
bool zxStream::flush() {
  if (state != State::writing || next == 0) return true;
  const std::size_t size = next;
  next = 0;
  return write_down(buffer, size);
}

bool zxStream::sync() {
  if (!flush()) return false;
  if (zxplat::files.flush(fd)) return true;
  write_failed = true;
  return false;
}

// ---- positions

// Serves a seek from the read buffer, which holds the bytes of the file up
// to `position`.
bool zxStream::move_within_buffer(std::int64_t offset) {
  if (state != State::reading || position < 0) return false;
  const std::int64_t start = position - static_cast<std::int64_t>(end);
  if (offset < start || offset > position) return false;
  next = static_cast<std::size_t>(offset - start);
  return true;
}

bool zxStream::seek(std::int64_t offset, zxplat::Whence whence) {
  at_end = false;
  if (whence == zxplat::Whence::start && move_within_buffer(offset))
    return true;
  if (!flush()) return false;
  if (whence == zxplat::Whence::current && state == State::reading)
    offset -= static_cast<std::int64_t>(end - next);
  next = end = 0;
  read_ahead = 0;
  position = zxplat::files.seek(fd, offset, whence);
  return position >= 0;
}

std::int64_t zxStream::tell() {
  std::int64_t at = position;
  if (at < 0) at = zxplat::files.seek(fd, 0, zxplat::Whence::current);
  if (at < 0) return -1;
  if (state == State::writing) return at + static_cast<std::int64_t>(next);
  return at - static_cast<std::int64_t>(end - next);
}
