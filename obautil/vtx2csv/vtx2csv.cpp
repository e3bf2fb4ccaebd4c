// vtx2csv.cpp - the export tool: identity, rows, and the run.
// Tests: tests/obautil/vtx2csv_test.cpp, tests/e2e/.
#include "vtx2csv.h"

#include <cstring>
#include <iterator>
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

// The letters of record types 0 to 2; every other type shows as NUL.
constexpr char k_type_letters[] = {'B', 'I', 'R', '\0'};

char type_letter(std::int32_t type) {
  constexpr std::int32_t k_last = std::size(k_type_letters) - 1;
  return k_type_letters[type >= 0 && type < k_last ? type : k_last];
}

// ---- cells

// Text cells have no quoting: these bytes go.
constexpr zxLogicalExport k_text_cells("\",");

// A line under composition.
class Row {
 public:
  explicit Row(const VtxRecord& source) : record(source) {}

  void add_cell(const ColumnDef& column);
  void add_separator();

  // The line, with a line feed in the place of the last separator.
  zxStr finish();

 private:
  static constexpr std::size_t k_text_room =
      zxLogicalExport::room_for(sizeof(VtxRecord));
  static constexpr std::size_t k_room = 8192;

  void add_text(std::string_view field);
  void add_date(zxDate date);
  void flush();

  const VtxRecord& record;
  zxStr line;         // what did not fit the room any more
  char room[k_room];  // cells are made here
  char* at = room;
};

// Text may run to the record's end, so a row has no limit worth reserving.
void Row::flush() {
  line.append(room, static_cast<std::int32_t>(at - room));
  at = room;
}

void Row::add_text(std::string_view field) {
  const std::string_view text = k_text_cells.convert(at, field);
  std::memmove(at, text.data(), text.size());
  at += text.size();
}

void Row::add_date(zxDate date) {
  if (date.write_text(at)) at += zxDate::k_text_length;
}

void Row::add_cell(const ColumnDef& column) {
  constexpr std::size_t k_cell_room = k_text_room + 2;  // and a separator
  if (static_cast<std::size_t>(at - room) > k_room - k_cell_room) flush();
  const std::int32_t i = column.index;
  if (column.type == k_num) {
    if (ZX_ASSERT(i >= 0 && i < VtxRecord::k_nums))
      at = record.num[i].write_text(at);
  } else if (column.type == k_text) {
    add_text(record.text_field(i));
  } else if (column.type == k_date) {
    if (ZX_ASSERT(i >= 0 && i < VtxRecord::k_dates)) add_date(record.dates[i]);
  } else if (column.type == k_natype) {
    *at++ = type_letter(record.type);
  } else {
    ZX_HERE;
    bailf("Unknown array type #", column.type);
  }
}

void Row::add_separator() {
  *at++ = ',';
  *at++ = ' ';
}

zxStr Row::finish() {
  if (at != room) {
    at[-2] = '\n';
    --at;
  }
  flush();
  return line;
}

}  // namespace

zxStr clean_text_field(const zxStr& text) {
  constexpr std::int32_t k_longest = 0x3FFFFFF0;
  if (!ZX_ASSERT(text.length() <= k_longest)) return {};
  zxStr room;
  const std::size_t size = zxLogicalExport::room_for(zx_size(text.length()));
  return zxStr(k_text_cells.convert(room.buffer(zx_count(size)), text.view()));
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
  Row row(record);
  for (const ColumnDef& column : columns) {
    row.add_cell(column);
    row.add_separator();
  }
  ZX_HERE;
  fprint(out, "#", row.finish());
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

  zxBFile out;
  const zxStr temporary = create_temp_file(out, "csv");
  write_table(out);
  out.close(no_detail);
  move_file(temporary, output);

  ZX_HERE;
  oprint("\ndone.\n");
  return 0;
}
