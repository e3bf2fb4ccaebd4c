// zxbfile.h - zxBFile, the library's one file class: a thin owner of a
// buffered stream that knows the file's name and counts text lines.
//
// Every file is opened in binary mode.  Operations report failure by their
// result or end the process with a numbered message, as each says; a
// BailDetail adds to that message.  The name "-" stands for the standard
// input and output in opening; closing such an object only flushes it.
//
// What was written waits in the stream's buffer: bytes that the system
// refuses may be told by a later write, the flush or the close, and the close
// tells them in any case, but for a standard stream, which it only flushes.
//
// After a failure that was dropped (see zxatsys.h) an operation returns
// false, 0, -1 or an empty text and leaves the object as it is.
//
//   zxBFile in;
//   in.open_or_die("names.txt");
//   zxStr line;
//   while (in.gets(line)) add_name(line);
#ifndef ZXBFILE_H
#define ZXBFILE_H

#include <cstddef>
#include <cstdint>

#include "zxfile.h"
#include "zxstr.h"

class zxBFile {
 public:
  zxBFile() = default;
  // Opens by open_or_die().
  explicit zxBFile(const zxStr& file_name) { open_or_die(file_name); }
  // Closes an open file; a failure of that is fatal (1010).
  ~zxBFile();
  zxBFile(const zxBFile&) = delete;
  zxBFile& operator=(const zxBFile&) = delete;

  bool is_open() const { return handle != nullptr; }

  // ---- opening.  An object that is open already ends the process (reading
  // 1009, creating and appending 1003, both 1005), whatever the name.  A name
  // of 255 bytes or more and an empty one are refused.  Nothing that is
  // opened locks others out.

  // Opens for reading; false on failure.
  bool open(const zxStr& file_name);
  // As open(); a failure is fatal (1002).
  void open_or_die(const zxStr& file_name,
                   const BailDetail& detail = no_detail);
  // Opens an existing file for reading and writing; false on failure.  The
  // name "-" fails an assertion.
  bool open_rw(const zxStr& file_name);
  // As open_rw(); a failure is fatal (1006).
  void open_rw_or_die(const zxStr& file_name,
                      const BailDetail& detail = no_detail);
  // Makes the file, or cuts it to nothing, for writing; false on failure.
  bool try_create(const zxStr& file_name);
  // As try_create(); a failure is fatal (1004).
  void create(const zxStr& file_name, const BailDetail& detail = no_detail);
  // Makes the file, or keeps what is in it, for writing at its end wherever
  // the position is; the position starts at the end.  False on failure.
  bool try_append(const zxStr& file_name);
  // As try_append(); a failure is fatal (1004).
  void append(const zxStr& file_name, const BailDetail& detail = no_detail);
  // As try_create() for a name that must be free: a file or a link of that
  // name is never followed or cut.
  bool try_create_new(const zxStr& file_name);
  // As try_create_new(); a failure is fatal (1004).
  void create_new(const zxStr& file_name, const BailDetail& detail = no_detail);
  // As try_create_new(), for a file that only its owner may read.
  bool try_create_private(const zxStr& file_name);

  // Takes a standard stream over under a name and switches it to binary; that
  // this fails is an assertion.  If the process was started without that
  // stream, the null device is opened for reading and writing instead.
  void attach(const zxStr& stream_name, zxStream& stream);

  // ---- closing.  A closed object is a success.  Whatever the result, the
  // object is closed afterwards and its name empty.
  bool close();
  // A failure is fatal (1010).
  void close(const BailDetail& detail);

  // What it was opened under; a closed file is fatal (1007).
  zxStr get_name() const;

  // ---- buffering
  // Has the stream buffer in full and read at least `size` bytes at once;
  // false on a closed file, for a size below 1, and if bytes that wait to be
  // written could not be.
  bool set_buffer(std::int32_t size);
  // The same for bulk reading, 24576 bytes; a failure is fatal (1011).
  void fastio();

  // ---- reading and writing
  // Reads up to `size` bytes and stores the count in `got` unless that is
  // null.  True if all came, or if `got` is given and some came; false at a
  // plain end of file.  A closed file and a failed read are fatal (1014).
  bool read(void* buffer, std::int32_t size, std::int32_t* got = nullptr,
            const BailDetail& detail = no_detail);
  // As read(), but a closed file and a failed read give false.
  bool try_read(void* buffer, std::int32_t size, std::int32_t* got = nullptr);
  // Reads exactly `size` bytes; a short count is fatal (1014).  The signed
  // size is checked: a negative one fails an assertion, as everywhere.
  bool read_all(void* buffer, std::size_t size,
                const BailDetail& detail = no_detail);
  bool read_all(void* buffer, std::int32_t size,
                const BailDetail& detail = no_detail);
  // Reads up to `size` bytes into `text`, which has as many in the end as
  // came; the result and the failures are those of read() with a count.
  bool read_str(zxStr& text, std::int32_t size);
  // The same, and that no byte came fails an assertion; fewer are accepted.
  bool read_str_all(zxStr& text, std::int32_t size);

  // Writes `size` bytes; failure and a closed file are fatal (1016).
  void write(const void* buffer, std::size_t size,
             const BailDetail& detail = no_detail);
  void write(const void* buffer, std::int32_t size,
             const BailDetail& detail = no_detail);
  // The same; a failure gives false, a closed file is still fatal.
  bool try_write(const void* buffer, std::int32_t size);

  // Writes down what is buffered; failure and a closed file are fatal (1020).
  void flush(const BailDetail& detail = no_detail);
  // The same, and forces it to the device.
  void sync(const BailDetail& detail = no_detail);

  // ---- bytes, straight through the stream's buffer.  On a closed file they
  // fail.
  // The next byte, 0 to 255; -1 at the end and on failure.
  int getc() { return handle != nullptr ? handle->get() : -1; }
  // Writes the low eight bits; gives them back, or -1 on failure.
  int putc(int byte) {
    const auto low = static_cast<unsigned char>(byte);
    const bool is_taken =
        handle != nullptr && handle->put(static_cast<char>(low));
    return is_taken ? low : -1;
  }
  // The end was met by a read, and no seek came since; true if closed.
  bool eof() const { return handle == nullptr || handle->eof(); }

  // ---- lines of text
  // Reads up to the next line feed, which stays in the text, or the end of
  // the file.  True if any byte came, and then the line is counted.  A closed
  // file is fatal (1025), and so is an error of the stream if no byte came
  // (1029) and a line of more than k_max_line bytes (2005).  The block of
  // `text` is used again if no other string shares it.
  bool gets(zxStr& text);
  static constexpr std::int32_t k_max_line = 2'147'483'600;
  // Writes the text's bytes and counts a line; no line end is added.  A
  // closed file is fatal (1024), a failed write too (1016).
  void puts(const zxStr& text);
  // Writes CR LF, which counts nothing; false on failure and if closed.
  bool newline();

  // ---- positions, in bytes from the start; true, if the call came back, says
  // that the position is as told
  // Moves to `position`; 0 also zeroes `lines`.  A closed file or a negative
  // position fails an assertion; a failure is fatal (1012).
  bool seek(std::int32_t position, const BailDetail& detail = no_detail);
  // The same; a failure of the stream gives false.
  bool try_seek(std::int32_t position);
  // Moves to the end; a failure or a closed file is fatal (1012).
  bool seek_end(const BailDetail& detail = no_detail);
  // The position; a closed file, or a position that does not fit 31 bits, is
  // fatal (1013, and -1 comes back).
  std::int32_t tell(const BailDetail& detail = no_detail);

  // ---- the file's size
  // The bytes that the file has for the system, without what waits in the
  // buffer; -1 on failure, and if they do not fit 31 bits.  A closed file is
  // fatal (1018).
  std::int32_t length() const;
  // The same; each failure is fatal (1019, and -1 comes back).
  std::int32_t length(const BailDetail& detail) const;
  // Flushes, and cuts the file or widens it by zeros; the position stays.
  // Failure and a closed file are fatal (1023).
  void chsize(std::int32_t size, const BailDetail& detail = no_detail);

  // ---- locks, which keep other processes and other objects out; zxplat.h
  // says in what they differ from system to system.  Both flush, forget what
  // was read ahead and move to `position`, as seek() does.  No bytes are a
  // success, a negative size fails an assertion.
  // Locks `size` bytes from `position` on, without waiting; false (system
  // error 33) if any of them is locked already, by this object or another.  A
  // closed file or a failed flush is fatal (1033), another failure too (1021).
  bool lock(std::int32_t position, std::int32_t size,
            const BailDetail& detail = no_detail);
  // Unlocks what was locked by one lock().  A closed file or a failed flush is
  // fatal (1092), and so is a failure or what is not exactly locked (1022).
  void unlock(std::int32_t position, std::int32_t size,
              const BailDetail& detail = no_detail);

  // ---- state, open to callers
  zxStream* handle = nullptr;  // null when closed
  zxStr name;                  // what it was opened under
  std::int32_t lines = 0;      // text lines passed since opening or seek(0)

 private:
  bool open_as(const zxStr& file_name, zxplat::OpenMode mode);
  bool is_standard() const;
  bool read_some(void* buffer, std::int32_t size, std::int32_t* got);
  void count_lines(std::int32_t more);
  bool read_line(zxStr& text);
  bool seek_as_told(std::int32_t position);
  bool prepare_lock(std::int32_t position, std::int32_t error,
                    const BailDetail& detail);
};

// The standard streams, named "-"; start-up opens them.
extern zxBFile g_stdin;
extern zxBFile g_stdout;
extern zxBFile g_stderr;

#endif  // ZXBFILE_H
