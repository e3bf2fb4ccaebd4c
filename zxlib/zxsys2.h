// zxsys2.h - operations on whole files by name: unique names, copying,
// moving, deleting.
//
// Names are in Win32 form, with the backslash as the separator and the
// forward slash accepted.  Operations without a result are fatal on failure,
// with the message that each names.
#ifndef ZXSYS2_H
#define ZXSYS2_H

#include "zxbfile.h"
#include "zxstr.h"

// The directory with a separator at its end: unchanged if it is empty, ends
// in a backslash or is just a drive such as "C:"; a final forward slash is
// replaced.
zxStr with_slash(const zxStr& directory);

// Everything of a name ahead of its last component, with the separator; and
// the last component.  A drive belongs to the directory.
zxStr dir_part(const zxStr& path);
zxStr file_part(const zxStr& path);

// The working directory, ending in a backslash.
zxStr working_directory();

// The system's directory for temporary files, ending in a backslash; asked
// for once.
const zxStr& temp_path();

// Forgets the temporary directory, so that the system is asked again.
void clear_temp_path();

// A name in `directory` that no file has: "tmp", a number and the extension,
// which is "tmp" if null; a dot at the very end goes.  Nothing is created or
// reserved.  Fatal when 30 names in a row are taken or cannot be judged
// (1037).
zxStr uniqfile(const zxStr& directory, const char* extension);

// The same in the temporary directory.
zxStr unique_temp_name(const char* extension);

// Creates a file in the temporary directory under such a name, which comes
// back, and leaves it open in `file`.  A file or a link that took the name
// in between is never opened; then the next name is tried.  Fatal on failure
// (1004, 1037).
zxStr create_temp_file(zxBFile& file, const char* extension);

// Deletes a file.  True if it is gone, also if it was not there.
bool try_delete(const zxStr& name);
// Deletes a file if it is there; failure is fatal (1027).
void delefile(const zxStr& name);
// Deletes a file; failure, also a missing file, is fatal (1026).
void delfile(const zxStr& name);

// Copies a file with its modification time, by way of a temporary name
// beside `to`, so that `to` is replaced by a complete copy only.  Fatal if
// `from` cannot be opened (1002), the copy not be made (1004, 1010, 1014,
// 1016, 1020, 1037), `to` not be deleted (1027) or the copy not be renamed
// (1038); in the last two cases the copy is deleted.
void cpfile(const zxStr& from, const zxStr& to);

// Renames a file, replacing `to`; across devices it is copied as by
// cpfile(), with its messages, and deleted (1026).  One file under both names,
// or a directory as `to`, fails an assertion.  Fatal if `from` is not there
// (1002), `to` cannot be deleted (1027) or the rename fails (1036).
//
// Across devices an existing `to` goes only when its successor is complete;
// on one device it is deleted just ahead of the rename.
void move_file(const zxStr& from, const zxStr& to);

#endif  // ZXSYS2_H
