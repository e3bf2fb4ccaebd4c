// zxbfile.h - zxBFile, the library's one file class: a thin owner of a
// buffered stream that knows the file's name and counts text lines.
//
// Every file is opened in binary mode.  Operations report failure by their
// result or end the process with a numbered message, as each says; a
// BailDetail adds to that message.  The name "-" stands for the standard
// input and output in opening; closing such an object only flushes it.
//
// After a failure that was dropped (see zxatsys.h) an operation returns
// false, 0 or -1 and leaves the object as it is.
#ifndef ZXBFILE_H
#define ZXBFILE_H

#include <cstddef>
#include <cstdint>

#include "zxfile.h"
#include "zxstr.h"

class zxBFile {
 public:
  zxBFile() = default;
  // Closes an open file; a failure of that is fatal (1010).
  ~zxBFile();
  zxBFile(const zxBFile&) = delete;
  zxBFile& operator=(const zxBFile&) = delete;

  bool is_open() const { return handle != nullptr; }

  // ---- opening.  An object that is open already ends the process (reading
  // 1009, creating 1003, both 1005).  A name of 255 bytes or more and an
  // empty one are refused.

  // Opens for reading; false on failure.
  bool open(const zxStr& file_name);
  // As open(); a failure is fatal (1002).
  void open_or_die(const zxStr& file_name,
                   const BailDetail& detail = no_detail);
  // Opens an existing file for reading and writing; false on failure.  The
  // name "-" fails an assertion.
  bool open_rw(const zxStr& file_name);
  // Makes the file, or cuts it to nothing, for writing; false on failure.
  bool try_create(const zxStr& file_name);
  // As try_create(); a failure is fatal (1004).
  void create(const zxStr& file_name, const BailDetail& detail = no_detail);
  // As try_create() for a name that must be free: a file or a link of that
  // name is never followed or cut.
  bool try_create_new(const zxStr& file_name);
  // As try_create_new(); a failure is fatal (1004).
  void create_new(const zxStr& file_name, const BailDetail& detail = no_detail);
  // As try_create_new(), for a file that only its owner may read.
  bool try_create_private(const zxStr& file_name);

  // ---- closing.  A closed object is a success.  Whatever the result, the
  // object is closed afterwards and its name empty.
  bool close();
  // A failure is fatal (1010).
  void close(const BailDetail& detail);

  // ---- reading and writing
  // Reads up to `size` bytes and stores the count in `got` unless that is
  // null.  True if all came, or if `got` is given and some came; false at a
  // plain end of file.  A closed file and a failed read are fatal (1014).
  bool read(void* buffer, std::int32_t size, std::int32_t* got = nullptr,
            const BailDetail& detail = no_detail);
  // Reads exactly `size` bytes; a short count is fatal (1014).
  bool read_all(void* buffer, std::int32_t size,
                const BailDetail& detail = no_detail);
  // Writes `size` bytes; failure and a closed file are fatal (1016).
  void write(const void* buffer, std::int32_t size,
             const BailDetail& detail = no_detail);
  // Writes the text's bytes and counts a line; no line end is added.  A
  // closed file is fatal (1024), a failed write too (1016).
  void puts(const zxStr& text);

  // Writes down what is buffered and forces it to the device; failure and a
  // closed file are fatal (1020).
  void sync(const BailDetail& detail = no_detail);

  // ---- positions, in bytes from the start; true, if the call came back, says
  // that the position is as told
  // Moves to `position`; 0 also zeroes `lines`.  A closed file or a negative
  // position fails an assertion; a failure is fatal (1012).
  bool seek(std::int32_t position, const BailDetail& detail = no_detail);
  // Moves to the end; a failure or a closed file is fatal (1012).
  bool seek_end(const BailDetail& detail = no_detail);
  // The position; a closed file, or a position that does not fit 31 bits, is
  // fatal (1013, and -1 comes back).
  std::int32_t tell(const BailDetail& detail = no_detail);

  // ---- state, open to callers
  zxStream* handle = nullptr;  // null when closed
  zxStr name;                  // what it was opened under
  std::int32_t lines = 0;      // text lines passed since opening or seek(0)

 private:
  bool open_as(const zxStr& file_name, zxplat::OpenMode mode);
  bool is_standard() const;
};

// The standard streams, named "-"; start-up opens them.
extern zxBFile g_stdin;
extern zxBFile g_stdout;
extern zxBFile g_stderr;

#endif  // ZXBFILE_H
