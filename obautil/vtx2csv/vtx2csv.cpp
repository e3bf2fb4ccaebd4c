// vtx2csv.cpp - the export tool: identity, rows, and the run.
// Tests: tests/obautil/vtx2csv_test.cpp, tests/e2e/.
#include "vtx2csv.h"

#include <cstdio>
#include <memory>

#include "zxaa.h"
#include "zxmainf.h"
#include "zxp2l.h"
#include "zxsfmt.h"
#include "zxsys2.h"
#include "zxusage.h"

// ---- the program's identity

std::uint32_t traits = k_trait_console | k_trait_executable;

const char* usage_text =
    "[-?] [-r9q directory] [csv-file]\n"
    "\n"
    "Converts r9qvtx.bin file to csv format\n"
    "-r9q - the directory where r9qhist.dat is at. default = use current "
    "dir.\n"
    "-? - display this help screen\r\n"
    "\r\n"
    "Program info: " __FILE__ " Compiled: " __DATE__ " " __TIME__;

namespace {

struct ProgramVersion {
  ProgramVersion() { program_version_text = "1.01a"; }
};
const ProgramVersion program_version_setter;

constexpr char k_default_output[] = "r9qvtx.csv";
constexpr char k_separator[] = ", ";

// The letters of record types 0 to 2; every other type shows as NUL.
constexpr char k_type_letters[] = {'B', 'I', 'R', '\0'};

char type_letter(std::int32_t type) {
  constexpr std::int32_t k_last = std::size(k_type_letters) - 1;
  return k_type_letters[type >= 0 && type < k_last ? type : k_last];
}

// ---- cells

void append_num(zxStr& line, HvlDecimal number) {
  char text[HvlDecimal::k_max_text];
  const char* end = number.write_text(text);
  line.append(text, static_cast<std::int32_t>(end - text));
}

void append_date(zxStr& line, zxDate date) {
  char text[zxDate::k_text_length];
  if (date.write_text(text)) line.append(text, zxDate::k_text_length);
}

bool is_deleted(char byte) { return byte == '"' || byte == ','; }

zxStr without_deleted(const zxStr& text) {
  zxStr kept;
  kept.reserve(text.length());
  for (const char byte : text.view())
    if (!is_deleted(byte)) kept.append(byte);
  return kept;
}

void append_cell(zxStr& line, const ColumnDef& column,
                 const VtxRecord& record) {
  const std::int32_t i = column.index;
  if (column.type == k_num) {
    append_num(line, record.num[i]);
  } else if (column.type == k_text) {
    line.append(clean_text_field(zxStr(record.text_field(i))));
  } else if (column.type == k_date) {
    append_date(line, record.dates[i]);
  } else if (column.type == k_natype) {
    line.append(type_letter(record.type));
  } else {
    ZX_HERE;
    bailf("Unknown array type #", column.type);
  }
}

}  // namespace

zxStr clean_text_field(const zxStr& text) {
  return without_deleted(ansi_to_utf8(logical_from_phys_lines(text, true)));
}

void write_header_row(zxBFile& out, std::span<const ColumnDef> columns) {
  zxSA<bool> seen;
  for (const ColumnDef& column : columns) {
    const zxStr code = column.code;
    ZX_HERE;
    if (seen.contains(code)) bailf("Code oba # already exist", code);
    ZX_HERE;
    fprint(out, &column == &columns.back() ? "#\n\n" : "#, ", code);
    seen.set(code, true);
  }
}

void write_record_row(const VtxRecord& record, zxBFile& out,
                      std::span<const ColumnDef> columns) {
  zxStr line;
  for (const ColumnDef& column : columns) {
    append_cell(line, column, record);
    line.append(&column == &columns.back() ? "\n" : k_separator);
  }
  ZX_HERE;
  fprint(out, "#", line);
}

// ---- the run

namespace {

void write_table(zxBFile& out) {
  static VtxRecord record;
  write_header_row(out);
  for (std::int32_t i = 0; i < vtx_count(); ++i) {
    std::construct_at(&record);
    if (vtx_read_by_index(i, record) != k_vtx_ok) continue;
    const bool is_free_slot = record.text[1][0] == '\0';
    if (!is_free_slot) write_record_row(record, out);
  }
}

void open_table(const zxStr& directory) {
  const int code = init_vtx(directory);
  ZX_HERE;
  if (code != k_vtx_ok) bailf("ERROR INIT VTX (#)", code);
}

zxStr or_default(const zxStr& text, const zxStr& fallback) {
  return text.is_empty() ? fallback : text;
}

}  // namespace

int zx_main() {
  init_opts("-?; -r9q :s");
  if (opt_on("-?")) show_usage("");
  open_table(or_default(g_opts.get("-r9q"), current_dir));
  const zxStr output = or_default(positional_arg(0), k_default_output);
  ZX_HERE;
  oprint("start converting to #", output);

  const zxStr temporary = unique_temp_name("csv");
  zxBFile out;
  out.create_new(temporary);
  write_table(out);
  out.close(no_detail);
  move_file(temporary, output);

  ZX_HERE;
  oprint("\ndone.\n");
  return 0;
}
