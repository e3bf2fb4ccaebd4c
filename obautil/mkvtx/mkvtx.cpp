// mkvtx.cpp - the tool that makes a table of securities from a text: identity
// and run.
// Tests: tests/e2e/mkvtx_e2e_test.cpp.
#include "vtxtext.h"
#include "vtxwrite.h"
#include "zxmainf.h"
#include "zxsfmt.h"
#include "zxusage.h"

// ---- the program's identity

std::uint32_t traits = k_trait_console | k_trait_executable;

const char* usage_text =
    "[-?] [-r9q] text-file [directory]\n"
    "\n"
    "Makes the table files D4WVTX.IDX and D4WVTX.BIN from a text.\n"
    "text-file - the table as UTF-8 text, - for the standard input\n"
    "directory - where the files go. default = use current dir.\n"
    "-r9q - names the files R9QVTX.IDX and R9QVTX.BIN\n"
    "-? - display this help screen\n";

namespace {

struct ProgramVersion {
  ProgramVersion() { program_version_text = "1.00"; }
};
const ProgramVersion program_version_setter;

}  // namespace

// ---- the run

int zx_main() {
  init_opts("-?; -r9q");
  if (opt_on("-?")) show_usage("");
  const zxStr text_name = positional_arg(0);
  if (text_name.is_empty()) show_usage("no text file is named");

  VtxTable table;
  if (!load_vtx_text(text_name, table)) return k_exit_failure;
  const zxStr directory = positional_arg(1);
  write_vtx_table(table, directory.is_empty() ? current_dir : directory,
                  opt_on("-r9q") ? k_r9q_names : k_d4w_names);

  ZX_HERE;
  oprint("# entries, # records\n", table.entries.length(),
         table.records.length());
  return 0;
}
