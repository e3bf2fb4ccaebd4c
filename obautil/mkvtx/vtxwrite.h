// vtxwrite.h - puts a table of securities to disk as its pair of files.
//
// Both files are written in full under temporary names beside the final ones
// and only then moved, so that a final name never holds half a file.
// Process-wide state: the file that is being written and the temporary names;
// a failure ends the process, and an exit handler deletes them then.
#ifndef VTXWRITE_H
#define VTXWRITE_H

#include "r9qvtxdb.h"
#include "vtxtable.h"
#include "zxstr.h"

// The names of a pair.
struct VtxFileNames {
  const char* index;
  const char* data;
};
inline constexpr VtxFileNames k_d4w_names = {k_d4w_index_name, k_d4w_data_name};
inline constexpr VtxFileNames k_r9q_names = {k_r9q_index_name, k_r9q_data_name};

// Writes the pair into a directory, which must be there, and replaces files
// of these names.  The empty directory is the working directory.  A failure
// is fatal: creating 1004, writing 1016, closing 1010, moving as move_file().
// If only the last move fails, the data file is new and the index is not.
void write_vtx_table(const VtxTable& table, const zxStr& directory,
                     const VtxFileNames& names);

// Deletes what a failed write left under temporary names; the exit handler.
void clear_unfinished_vtx();

#endif  // VTXWRITE_H
