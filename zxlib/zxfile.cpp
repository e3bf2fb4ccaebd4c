// zxfile.cpp - the buffered stream.
// Tests: tests/zxlib/zxfile_test.cpp.
#include "zxfile.h"

#include <algorithm>
#include <cstring>
#include <new>

#include "zxatsys.h"
#include "zxmisc.h"

namespace {

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
    stream->go_idle();
    stream->forget_held_ranges();
    stream->position = -1;
    stream->write_failed = false;
  }
}

bool zxStream::close(zxStream* stream) {
  const bool written = stream->flush() && !stream->write_failed;
  const bool closed = stream->close_descriptor();
  stream->leave_open_streams();
  stream->forget_held_ranges();
  stream->drop_buffer();
  stream->~zxStream();
  zx_realloc(stream, 0);
  return written && closed;
}

// ---- the buffer

void zxStream::take_buffer() {
  next = end = 0;
  if (buffer == nullptr)
    buffer = static_cast<char*>(zx_realloc(nullptr, capacity));
  set_room_end();
}

// The byte that fills the buffer goes the long way: it is written down at
// once.
void zxStream::set_room_end() {
  room_end = state == State::writing && !unbuffered ? capacity - 1 : 0;
}

void zxStream::go_idle() {
  state = State::idle;
  next = end = room_end = 0;
}

void zxStream::set_unbuffered() {
  unbuffered = true;
  set_room_end();
}

// Resizing the block keeps what is unread.
bool zxStream::set_buffer(std::size_t size) {
  if (fd == zxplat::k_no_fd || size == 0 || !flush()) return false;
  if (size > capacity) {
    capacity = size;
    if (buffer != nullptr)
      buffer = static_cast<char*>(zx_realloc(buffer, capacity));
  }
  first_read_ahead = std::max(size, k_first_read_ahead);
  unbuffered = false;
  set_room_end();
  return true;
}

void zxStream::drop_buffer() {
  go_idle();
  if (buffer != nullptr) zx_realloc(buffer, 0);
  buffer = nullptr;
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
  if (read_ahead < first_read_ahead) read_ahead = first_read_ahead;
  if (read_ahead > capacity) read_ahead = capacity;
  end = read_from_system(buffer, read_ahead);
  if (read_ahead < capacity) read_ahead *= 2;
}

std::string_view zxStream::unread_from_system() {
  if (!begin_reading()) return {};
  if (next == end) fill();
  return {buffer + next, end - next};
}

int zxStream::get_from_system() {
  if (unread_from_system().empty()) return -1;
  return static_cast<unsigned char>(buffer[next++]);
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
    if (left >= capacity) {
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

bool zxStream::drop_unread() {
  if (state != State::reading) return true;
  const bool is_at_position = give_back_unread();
  if (!is_at_position) position = -1;
  next = end = 0;
  read_ahead = 0;
  return is_at_position;
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
  while (next + size >= capacity) {
    const std::size_t piece = capacity - next;
    std::memcpy(buffer + next, from, piece);
    next = capacity;
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

// ---- the size

bool zxStream::set_size(std::int64_t size) {
  return flush() && drop_unread() && zxplat::files.set_size(fd, size);
}

// ---- locks

struct zxStream::HeldRange {
  std::int64_t start;
  std::int64_t size;
  HeldRange* next;
};

// The link to the range that is exactly this; null if none is held.
zxStream::HeldRange** zxStream::find_held(std::int64_t start,
                                          std::int64_t size) {
  for (HeldRange** link = &held; *link != nullptr; link = &(*link)->next)
    if ((*link)->start == start && (*link)->size == size) return link;
  return nullptr;
}

bool zxStream::holds_any_of(std::int64_t start, std::int64_t size) const {
  for (const HeldRange* range = held; range != nullptr; range = range->next)
    if (start < range->start + range->size && range->start < start + size)
      return true;
  return false;
}

void zxStream::forget_held_ranges() {
  while (held != nullptr) {
    HeldRange* const range = held;
    held = range->next;
    zx_realloc(range, 0);
  }
}

// The systems differ in what they make of a stream that meets its own locks,
// so they are never asked.
bool zxStream::lock(std::int64_t start, std::int64_t size) {
  if (holds_any_of(start, size)) {
    zxplat::set_last_error(zxplat::k_err_lock);
    return false;
  }
  if (!zxplat::files.lock(fd, start, size)) return false;
  held = ::new (zx_realloc(nullptr, sizeof(HeldRange)))
      HeldRange{start, size, held};
  return true;
}

bool zxStream::unlock(std::int64_t start, std::int64_t size) {
  HeldRange** const link = find_held(start, size);
  if (link == nullptr) {
    zxplat::set_last_error(zxplat::k_err_not_locked);
    return false;
  }
  if (!zxplat::files.unlock(fd, start, size)) return false;
  HeldRange* const range = *link;
  *link = range->next;
  zx_realloc(range, 0);
  return true;
}
