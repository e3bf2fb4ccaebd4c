// zxfile.h - zxStream, the library's buffered stream over a descriptor of
// the platform.
//
// The library uses no stdio: here each system call can be made to fail by a
// test, the buffer is open to callers that read byte by byte, and a failed
// close is never repeated on freed memory.  All streams are binary.
//
// A stream is idle, reading or writing, and changes over by itself: unread
// bytes are given back to the file, unwritten ones are flushed.  A seek to a
// place whose bytes are in the read buffer costs no system call.
//
// Read-ahead adapts: it starts small behind each seek and doubles while the
// reading goes on in sequence, so that scattered records cost one small read
// each and whole files few large ones.  set_buffer() has it start larger.
//
// Bytes of other writers that lie in the read buffer go unseen until
// drop_unread() or a seek out of the buffer.
#ifndef ZXFILE_H
#define ZXFILE_H

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "zxplat.h"

class zxStream {
 public:
  // A stream over an open descriptor, which the stream does not own until
  // close() is called.  The buffer is taken at the first use.
  constexpr explicit zxStream(zxplat::Fd descriptor) : fd(descriptor) {}
  zxStream(const zxStream&) = delete;
  zxStream& operator=(const zxStream&) = delete;

  // Opens a file; null on failure, the reason in zxplat::last_error().  The
  // stream goes by close() only.
  static zxStream* open(std::string_view name, zxplat::OpenMode mode);

  // Flushes, closes the descriptor and destroys a stream that open() made,
  // whatever the result; false if data may not have reached the file, now or
  // at an earlier write.
  static bool close(zxStream* stream);

  // Writes down and closes the files of all streams that open() made.  The
  // streams stay, without a descriptor: reading fails, and so does writing
  // once the buffer is to be written down; close() is a success unless bytes
  // were lost since.  It is for a process that needs their descriptors for
  // its last words.
  static void close_all();

  // Writes down what all of them have buffered, for the end of the process.
  static void flush_all();

  // Reads up to `size` bytes; the count.  A short count sets eof() or
  // error().
  std::size_t read(void* out, std::size_t size);

  // Takes `size` bytes for writing; false, and error() set, if the system
  // refused bytes.
  bool write(const void* bytes, std::size_t size);

  // One byte, 0 to 255, through the buffer; -1 at the end and on failure, as
  // read() tells them.
  int get() {
    if (next < end) [[likely]]
      return static_cast<unsigned char>(buffer[next++]);
    return get_from_system();
  }

  // Takes a byte for writing, as write() does.
  bool put(char byte) {
    if (next < room_end) [[likely]] {
      buffer[next++] = byte;
      return true;
    }
    return write(&byte, 1);
  }

  // The unread bytes of the buffer, which is filled if there are none: empty
  // at the end and on failure, as read() tells them.  Valid up to the next
  // call of another function but skip().
  std::string_view unread() {
    if (next < end) [[likely]]
      return {buffer + next, end - next};
    return unread_from_system();
  }

  // Passes over bytes that unread() showed.
  // REQUIRES: count <= unread().size().
  void skip(std::size_t count) { next += count; }

  // Writes down what write() took; false on failure.
  bool flush();

  // The same, and forces the file's bytes to the device.
  bool sync();

  // Moves the position; false, the position unknown, on failure.  Clears
  // eof().
  bool seek(std::int64_t offset, zxplat::Whence whence);

  // The position, or -1.
  std::int64_t tell();

  // Forgets what was read ahead, so that the next bytes come from the file as
  // it is then; false, the position unknown, if the descriptor could not be
  // moved back over them.
  bool drop_unread();

  // The file's size as the system has it, or -1; what waits in the buffer
  // does not count.
  std::int64_t size() { return zxplat::files.size(fd); }

  // Flushes and sets the file's size; the position stays.  False on failure.
  bool set_size(std::int64_t size);

  // Locks bytes of the file, at least one, against other processes and
  // streams, and unlocks exactly what was locked; zxplat.h says what that
  // means on which system.  False on failure: what this stream holds itself
  // counts as held by another (33), what it does not hold is not locked
  // (158).
  bool lock(std::int64_t start, std::int64_t size);
  bool unlock(std::int64_t start, std::int64_t size);

  // An end of file was met; a system call failed since the stream was made.
  bool eof() const { return at_end; }
  bool error() const { return read_failed || write_failed; }

  // Writes reach the system at once, not when the buffer is full; for
  // streams that a person reads.
  void set_unbuffered();

  // Buffers in full, with at least `size` bytes, of which as many are read at
  // once from the start on; nothing that waits in the buffer is lost.  False
  // if bytes could not be written down, if there is no descriptor any more or
  // if the size is 0.
  bool set_buffer(std::size_t size);

  // Forgets what is in the buffer, unread or unwritten, and gives its memory
  // back until the next use.
  void drop_buffer();

  zxplat::Fd descriptor() const { return fd; }

 private:
  static constexpr std::size_t k_buffer_size = 65536;
  // What is read at once behind a seek; it doubles up to the whole buffer.
  static constexpr std::size_t k_first_read_ahead = 4096;

  enum class State : std::uint8_t { idle, reading, writing };
  struct HeldRange;

  void join_open_streams();
  void leave_open_streams();
  bool close_descriptor();

  void take_buffer();
  void go_idle();
  void set_room_end();
  void fill();
  bool begin_reading();
  bool begin_writing();
  bool give_back_unread();
  int get_from_system();
  std::string_view unread_from_system();
  HeldRange** find_held(std::int64_t start, std::int64_t size);
  bool holds_any_of(std::int64_t start, std::int64_t size) const;
  void forget_held_ranges();
  bool write_down(const char* bytes, std::size_t size);
  bool move_within_buffer(std::int64_t offset);
  std::size_t read_from_system(char* out, std::size_t size);
  std::size_t read_from_buffer(char* out, std::size_t size);

  zxplat::Fd fd;
  State state = State::idle;
  bool at_end = false;
  bool read_failed = false;
  bool write_failed = false;  // bytes were lost: close() will say so
  bool unbuffered = false;
  bool appends = false;

  // Reading: bytes [next, end) are unread, room_end is 0.  Writing: bytes
  // [0, next) are to be written, end is 0, and a byte at a place ahead of
  // room_end fits without a call.
  char* buffer = nullptr;
  std::size_t next = 0;
  std::size_t end = 0;
  std::size_t room_end = 0;
  std::size_t capacity = k_buffer_size;
  std::size_t first_read_ahead = k_first_read_ahead;
  std::size_t read_ahead = 0;

  // The descriptor's position where it is known, else -1.
  std::int64_t position = -1;

  // The bytes that are locked, the latest first.
  HeldRange* held = nullptr;

  // The neighbours in the list of the streams that open() made.
  zxStream* newer = nullptr;
  zxStream* older = nullptr;
};

// The streams of the three standard descriptors; they live as long as the
// process and are never closed.
zxStream& zx_standard_stream(zxplat::Fd descriptor);

#endif  // ZXFILE_H
