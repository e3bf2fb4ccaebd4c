// zxsys2.h - operations on whole files and on folders by name: reading and
// writing, comparing, copying, moving, deleting, folders, disks, the
// environment.
//
// Names are in Win32 form; see zxnextf.h for what is done to the names
// themselves.  Operations without a result are fatal on failure, with the
// message that each names.  After a failure that was dropped they return a
// neutral value, and nothing is deleted that was not replaced.
//
// Process-wide state: the directory for temporary files.
#ifndef ZXSYS2_H
#define ZXSYS2_H

#include <cstdint>

#include "zxbfile.h"
#include "zxnextf.h"
#include "zxqva.h"
#include "zxstr.h"

// ---------------------------------------------- reading, writing files --

// Writes a text to a file, which is replaced, or added to with `append`.
// True if all of it is in the file, the close included.  A file that is
// replaced is cut first: who must not lose the old text writes another file
// and moves it.
bool str2file(const zxStr& name, const zxStr& text, bool append = false);
// The same; false fails an assertion.
void str2file_or_die(const zxStr& name, const zxStr& text, bool append = false);

// Writes lines, each with CR LF behind it unless its first byte is a line
// feed.
bool lines2file(const zxStr& name, const zxQVA<zxStr>& lines,
                bool append = false);
void lines2file_or_die(const zxStr& name, const zxQVA<zxStr>& lines,
                       bool append = false);

// Reads all of a file, but not more than k_most_read bytes.  False, and the
// text empty, if it cannot be opened; a failed read is fatal (1014).
inline constexpr std::int32_t k_most_read = 0x7FFFFFBF;
bool file2str(const zxStr& name, zxStr& text);

// Reads the lines of a file in place of what `lines` holds, each without its
// line end.  False, and no lines, if it cannot be opened; a failed read is
// fatal (1029).
bool file2lines(const zxStr& name, zxQVA<zxStr>& lines);
// The same for files of settings: a line ends at the first of the characters
// of `comment` ("#" if null), is trimmed at both ends, and is dropped if
// nothing is left.
bool file2conflines(const zxStr& name, zxQVA<zxStr>& lines,
                    const char* comment = nullptr);

// Copies `size` bytes from where `in` stands to where `out` stands, or all up
// to the end of `in` for -1.  Fatal if `in` has fewer or a read fails (1014),
// or a write fails (1016).  What has no end, such as some devices, is read up
// to the size that it tells, but at least 0x7FFFFFFF bytes (then 1014).
void copy_stream(zxBFile& in, zxBFile& out, std::int32_t size = -1);

// Adds the bytes of `from` to the end of `to`, which is made if it is missing.
// Fatal: 1002, 1004, 1010, 1014, 1016.  One file under both names fails an
// assertion.
void append_file(const zxStr& from, const zxStr& to);

// ------------------------------------------------------------ comparing --

// Compares two files; a failed read is fatal (1014).
inline constexpr std::int32_t k_files_same = 0;       // also in their time
inline constexpr std::int32_t k_files_same_data = 1;  // the times differ
inline constexpr std::int32_t k_files_differ = 2;
inline constexpr std::int32_t k_files_unlike = 3;  // in size, or not opened
std::int32_t compare_files(const zxStr& a, const zxStr& b);

// True if they hold the same bytes.
bool same_files(const zxStr& a, const zxStr& b);

// The checksum crc16() of all bytes of a file; fatal if it cannot be opened
// (1002) or read (1014).
std::uint16_t file_crc(const zxStr& name);

// ------------------------------------------------------ copying, moving --

// Copies a file with its modification time, by way of a temporary name
// beside `to`, so that `to` is replaced by a complete copy only.  Fatal if
// `from` cannot be opened (1002), the copy not be made (1004, 1010, 1014,
// 1016, 1037), `to` not be deleted (1027) or the copy not be renamed
// (1038); in the last two cases the copy is deleted, unless `to` was the file
// `from` itself: then the copy is all that is left of it, and stays.
void cpfile(const zxStr& from, const zxStr& to);

// Renames a file, replacing `to`; across devices it is copied as by
// cpfile(), with its messages and 1020, and deleted (1026).  One file under
// both names, or a directory as `to`, fails an assertion.  Fatal if `from` is
// not there (1002), `to` cannot be deleted (1027) or the rename fails (1036).
//
// Across devices an existing `to` goes only when its successor is complete;
// on one device it is deleted just ahead of the rename.
void move_file(const zxStr& from, const zxStr& to);

// Does so for all files of a walk over `pattern`, each to its own name in the
// directory `dir`; fatal if there is no such directory (1034, 1035).
void cpfiles2dir(const zxStr& pattern, const zxStr& dir);
void mvfiles2dir(const zxStr& pattern, const zxStr& dir);

// Gives `to` the modification time of `from`, as its access time as well; a
// failure is an assertion.
void copy_time(const zxStr& from, const zxStr& to);

// ------------------------------------------------------------- deleting --

// Deletes a file.  True if it is gone, also if it was not there; a missing
// folder is a failure.
bool try_delete(const zxStr& name);
// Deletes a file if it is there; failure is fatal (1027).
void delefile(const zxStr& name);
// Deletes a file; failure, also a missing file, is fatal (1026).
void delfile(const zxStr& name);
// Deletes all files of a walk over `pattern` as delefile() does.
void delfiles(const zxStr& pattern);

// ---------------------------------------------------------- directories --

// Makes a directory in one that exists; separators at its end do not count.
bool try_createdir(const zxStr& name);
// The same; a failure is fatal (1030).
void createdir(const zxStr& name);

// Makes a directory with all that are missing above it; true if it is there
// in the end.  The chain must begin somewhere: with a root, a drive or a
// directory that exists.  So a relative name whose first component is missing
// is false: make_path("a\\b") makes "b" in "a", but not "a".
bool make_path(const zxStr& name);
// The same; false is fatal (1032).
void make_path_or_die(const zxStr& name);

// Deletes an empty directory; failure is fatal (1031).
void deldir(const zxStr& name);

// The working directory, without a backslash at its end unless it is a root.
zxStr get_cwd();

// Changes the working directory and returns the old one; an empty name
// changes nothing.  Failure is fatal (1032), and so is a drive alone.
zxStr chg_dir(const zxStr& name);

// ---------------------------------------------------------------- disks --

// The free space on the disk of a drive, 0 for the current one, in units of
// `unit` bytes, at most 0x7FFFFFFF.  The division comes first, so that it
// goes in steps of a sector.  A drive that there is not is fatal (1028); a
// unit of 0 fails an assertion.
std::int32_t diskfree(char drive_letter, std::uint32_t unit);
std::int32_t disk_bytes(char drive_letter);
std::int32_t disk_kb(char drive_letter);

// True if the disk of a drive can be asked for its space.  What is no letter
// fails an assertion.
bool drive_ok(char drive_letter);

// True if there are 512000 bytes left on the drive that a path names, or on
// the current one, and files can be made in the directory `path`.
bool space_for(const zxStr& path);

// ---------------------------------------------- temporary, environment --

// The system's directory for temporary files, ending in a backslash; asked
// for once.
const zxStr& temp_path();

// Forgets the temporary directory, so that the system is asked again.
void clear_temp_path();

// A name in `directory` that no file has, as of try_uniqfile(); fatal if none
// is found (1037).
zxStr uniqfile(const zxStr& directory, const char* extension = nullptr);

// The same in the temporary directory.
zxStr unique_temp_name(const char* extension = nullptr);

// Creates a file in the temporary directory under such a name, which comes
// back, and leaves it open in `file`.  A file or a link that took the name
// in between is never opened; then the next name is tried.  Fatal on failure
// (1004, 1037).
zxStr create_temp_file(zxBFile& file, const char* extension);

// The value of a variable of the environment, or the empty string.
zxStr get_env(const zxStr& name);

// Has standard output, this library's and the descriptor itself, go to the
// end of a file, which is made if it is missing.  Failures are assertions.
void redirect_stdout(const zxStr& name);

#endif  // ZXSYS2_H
