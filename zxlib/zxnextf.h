// zxnextf.h - names of files: taking them apart and putting them together,
// and the walk over all the names that a pattern stands for.
//
// Names are in Win32 form.  The backslash is the separator, the forward
// slash is accepted; a name may begin with a drive ("C:") or a server
// ("\\server\").  Functions on names look at the text alone, but for the
// walk and the unique names.
#ifndef ZXNEXTF_H
#define ZXNEXTF_H

#include <cstdint>
#include <string_view>

#include "zxbfile.h"
#include "zxqva.h"
#include "zxstr.h"

// ---------------------------------------------------------- path names --

// A name taken apart.
//
//   text                dir         name     also
//   "a\b.txt"           "a"         "b.txt"  relative
//   "C:b.txt"           "C:"        "b.txt"  relative, drive 3
//   "C:\"               "C:\"       ""       drive 3
//   "t\\*.txt"          "t"         "*.txt"  relative, recursive, not valid
//   "\\srv\share\a"     "\\srv\share" "a"    server "srv"
struct zxPath {
  // Takes a text apart; with `is_dir` all of it is the directory.  So it is
  // also if the text ends in a backslash.  An empty text fails an assertion,
  // and so do three backslashes at the end of the directory, unless they
  // belong to a root.
  explicit zxPath(const zxStr& text, bool is_dir = false);

  zxStr path;                // the text
  zxStr name;                // the last component; empty for a directory
  zxStr dir;                 // what stands ahead of it, without the backslash
                             // that separates them; a root keeps its own
  char drive_letter = '\0';  // in upper case, 0 if there is none
  std::int32_t drive = -1;   // 1 for A and so on
  bool relative = true;      // no separator behind drive or server
  bool valid = false;        // legal syntax: no empty component, none of 215
                             // bytes or more, and none of "*:<>?| in it.
                             // A drive or a server alone is not valid.
  zxStr server;              // of a name that begins with two backslashes
  bool recursive = false;    // two backslashes end the directory: the name
                             // stands for itself in all folders below, too

 private:
  std::int32_t take_drive_or_server();
  void take_directory(std::int32_t start, bool is_dir);
  void strip_directory();
};

// True if a name begins with a drive, as in "C:".
bool path_has_drive(std::string_view path);

// The directory with a backslash at its end: unchanged if it is empty, ends
// in one or is just a drive such as "C:", so that "C:" and "x" join to
// "C:x", a name relative to the drive.  A final forward slash is replaced.
zxStr with_slash(const zxStr& directory);

// Removes the backslashes at the end, at most two; how many there were.  A
// lone backslash and the root of a drive, "X:\", stay.  A third one fails an
// assertion.
std::int32_t strip_slash(zxStr& path);

// A directory and a name in one: "a" and "b" give "a\b".  A dot and a
// separator at the start of the name are dropped; an empty name, and ".",
// give the directory with its backslash.
zxStr path_join(const zxStr& directory, const zxStr& name);
zxStr operator/(const zxStr& directory, const zxStr& name);
zxStr operator/(const zxStr& directory, const char* name);
zxStr operator/(const char* directory, const zxStr& name);
zxStr& operator/=(zxStr& directory, const zxStr& name);
zxStr& operator/=(zxStr& directory, const char* name);

// The name in double quotes if it holds a blank and is not in quotes.
zxStr quote_path(const zxStr& path);

// Takes a name apart as zxPath does; the result is `recursive`.
bool split_path(const zxStr& path, zxStr& dir, zxStr& name);

// The two parts alone; the directory with its backslash.
zxStr file_part(const zxStr& path);
zxStr dir_part(const zxStr& path);

// What zxPath says of the whole text as a directory.  Empty is not valid,
// and fails an assertion in the second.
bool path_valid(const zxStr& path);
bool path_relative(const zxStr& path);

// -------------------------------------------------------- unique names --

// A name in `directory` that no file has: "tmp", a number and the extension,
// which is "tmp" if null; a dot at the very end goes.  Nothing is created or
// reserved.  False, and the last name tried in `name`, when 30 names in a
// row are taken or cannot be judged.
bool try_uniqfile(const zxStr& directory, const char* extension, zxStr& name);

// Creates a file under such a name by `create`, one of the operations of
// zxBFile that refuse a name that is taken.  Another process may have taken
// it in between; then the next one is tried.  False if no name was found
// (`file` is closed) or the last one could not be created.
enum class zxUnique { created, no_name, not_created };
using zxCreateNew = bool (zxBFile::*)(const zxStr&);
zxUnique create_unique(zxBFile& file, zxCreateNew create,
                       const zxStr& directory, const char* extension,
                       zxStr& name);

// ------------------------------------------------------------- walking --

// True if a name fits a pattern: "*" stands for any bytes, "?" for one, and
// "*.*" for every name; case is ignored for ASCII letters.  An empty pattern
// fits nothing.
bool name_matches(std::string_view pattern, std::string_view name);

// Takes the next name from a list of specifications, the state of a walk:
// the caller fills it and calls until the result is false.
//
//   zxQVA<zxStr> list;
//   list.append("data\\\\*.vtx");  // in "data" and in all folders below
//   for (zxStr name; next_file(list, name);) ...
//
// A specification with "*" or "?" in its last component stands for the files
// that match, and for the folders too if `with_dirs`; one without, or whose
// match is nothing, stands for itself, but is dropped if it holds a wildcard.
// With two backslashes ahead of the last component it stands for the matches
// in that folder and then for those in every folder below; links to folders
// are not entered.  Empty specifications are skipped.
//
// Names that were matched come back in lower case, the folder included, each
// once, in the system's order; the folder keeps its spelling if it would be
// another one in lower case.  A plain name comes back as it is, whether or
// not there is such a file.
bool next_file(zxQVA<zxStr>& list, zxStr& name, bool with_dirs = false);

// Appends all names of a walk to `out`.
void all_files_of(zxQVA<zxStr>& list, zxQVA<zxStr>& out);

// Closes `file`, which is fatal on failure (1010), and opens the next file of
// the list that can be read, with a buffer of 16384 bytes; for each that
// cannot, "Can't open file " and the name go to standard error.  False at the
// end of the list.
bool open_next(zxBFile& file, zxQVA<zxStr>& list);

#endif  // ZXNEXTF_H
