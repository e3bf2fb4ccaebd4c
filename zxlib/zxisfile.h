// zxisfile.h - questions about one file, asked in a small language of
// letters.
//
// No question ends the process, but for a letter that there is not, and a
// name that ends in three backslashes.
#ifndef ZXISFILE_H
#define ZXISFILE_H

#include <cstdint>

#include "zxqva.h"
#include "zxstr.h"

// True if something has the name and all letters of `tests`, which may be
// null, hold for it:
//
//   d  a directory             r  can be opened for reading
//   f  a regular file          w  can be written to, see below
//   c  a character device      x  its owner may execute it
//   s  the size is not zero    B  its first bytes look binary
//   z  the size is zero        T  it is not empty, can be opened, and its
//                                 first bytes do not look binary
//
// A file can be written to if it can be opened for it, a directory if a file
// can be made in it; that is tried, and leaves nothing behind.  A name that
// ends in a backslash is that of a directory or of nothing.  Pipes and
// sockets are nothing.  Another letter fails an assertion and does not hold.
//
// `size` (bytes, 0 for a directory) and `time` (of the last change, seconds
// since 1970-01-01 00:00 UTC) may be null; they are stored when the name was
// found, whatever the tests say, and end at the limits of 32 bits.
bool isfile(const zxStr& name, const char* tests = nullptr,
            std::int32_t* size = nullptr, std::int32_t* time = nullptr);

// The two values alone; 0 if the name is not there.
std::int32_t file_size(const zxStr& name);
std::int32_t file_time(const zxStr& name);

// True if some name of the walk over `pattern` passes the tests; if all of
// them do, also if there is none.  See next_file(); the tests may be null.
bool any_file(const zxStr& pattern, const char* tests);
bool all_files(const zxStr& pattern, const char* tests);

#endif  // ZXISFILE_H
