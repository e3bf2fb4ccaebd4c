// vtxtext.cpp - the text form of a table.
// Tests: tests/obautil/vtxtext_test.cpp.
#include "vtxtext.h"

#include <algorithm>
#include <cstring>
#include <iterator>

#include "vtxvalue.h"
#include "zxaa.h"
#include "zxbfile.h"
#include "zxsfmt.h"
#include "zxsys2.h"

namespace {

// A decimal holds every whole number up to this, so every code can stand in
// its record.
constexpr std::int64_t k_max_code = 1000000000;

constexpr std::int32_t k_text_room = VtxRecord::k_text_size - 1;
constexpr std::int32_t k_name_room = sizeof(VtxIndexEntry::name) - 1;

// The record types by their letters in the CSV file.
constexpr std::string_view k_types[] = {"B", "I", "R"};

constexpr char k_data_id[] = {'R', '9', 'Q', 'V', 'T', 'X'};
constexpr char k_oldest_version[] = {'1', '0', '1'};

VtxDataHead new_head() {
  VtxDataHead head = {};
  std::memcpy(head.id, k_data_id, sizeof head.id);
  std::memcpy(head.version, k_oldest_version, sizeof head.version);
  return head;
}

VtxRecord new_record() {
  VtxRecord record;
  std::memset(static_cast<void*>(&record), 0, sizeof record);
  return record;
}

// Where a line may stand.
enum class Place : std::uint8_t { anywhere, ahead_of_entries, in_record };

// The things that each record, or the table, has once.
struct Given {
  std::uint64_t nums = 0;
  std::uint32_t texts = 0;
  std::uint32_t dates = 0;
  std::uint32_t type = 0;
};

class Parser {
 public:
  Parser(VtxTable& made, VtxTextError& found) : table(made), error(found) {
    table.head = new_head();
  }

  bool parse(std::string_view text);

 private:
  struct Directive {
    std::string_view word;
    Place place;
    bool (Parser::*parse)(std::string_view rest);
  };
  static const Directive k_directives[];
  static const Directive* find_directive(std::string_view word);

  bool parse_line(std::string_view line);
  bool check_place(const Directive& directive);
  bool check_end();

  bool parse_code_page(std::string_view rest);
  bool parse_table_date(std::string_view rest);
  bool parse_version(std::string_view rest);
  bool parse_stamp(std::string_view rest);
  bool parse_security(std::string_view rest);
  bool parse_no_record(std::string_view rest);
  bool parse_type(std::string_view rest);
  bool parse_text(std::string_view rest);
  bool parse_dos_text(std::string_view rest);
  bool parse_windows_text(std::string_view rest);
  bool parse_num(std::string_view rest);
  bool parse_date(std::string_view rest);

  bool add_entry(std::string_view rest, std::int32_t offset);
  bool check_code(std::int32_t code);
  bool add_text(std::string_view rest, VtxCodePage page);
  bool take_index(std::string_view& rest, std::int32_t count,
                  std::int32_t& index);
  template <class Bits>
  bool claim(Bits& bits, const char* word, std::int32_t index);
  bool fail(const zxStr& what);

  VtxRecord& record() { return table.records.last(); }

  VtxTable& table;
  VtxTextError& error;
  VtxCodePage page = VtxCodePage::dos;
  zxDate table_date;
  zxSA<std::int32_t> lines_of_codes;  // a code's text to its line
  bool is_in_record = false;
  Given given;
};

const Parser::Directive Parser::k_directives[] = {
    {"codepage", Place::anywhere, &Parser::parse_code_page},
    {"table-date", Place::ahead_of_entries, &Parser::parse_table_date},
    {"version", Place::ahead_of_entries, &Parser::parse_version},
    {"stamp", Place::ahead_of_entries, &Parser::parse_stamp},
    {"security", Place::anywhere, &Parser::parse_security},
    {"no-record", Place::anywhere, &Parser::parse_no_record},
    {"type", Place::in_record, &Parser::parse_type},
    {"text", Place::in_record, &Parser::parse_text},
    {"text-862", Place::in_record, &Parser::parse_dos_text},
    {"text-1255", Place::in_record, &Parser::parse_windows_text},
    {"num", Place::in_record, &Parser::parse_num},
    {"date", Place::in_record, &Parser::parse_date},
};

const Parser::Directive* Parser::find_directive(std::string_view word) {
  for (const Directive& directive : k_directives)
    if (directive.word == word) return &directive;
  return nullptr;
}

bool Parser::fail(const zxStr& what) {
  error.what = what;
  return false;
}

// ---- lines

// file = [ byte order mark ] { line LF }
bool Parser::parse(std::string_view text) {
  constexpr std::string_view k_byte_order_mark = "\xEF\xBB\xBF";
  if (text.starts_with(k_byte_order_mark))
    text.remove_prefix(k_byte_order_mark.size());
  error.line = 0;
  while (!text.empty()) {
    ++error.line;
    const std::string_view line = text.substr(0, text.find('\n'));
    text.remove_prefix(line.size());
    if (!text.empty()) text.remove_prefix(1);
    if (!is_utf8(line)) return fail("the line is not UTF-8");
    if (!parse_line(zx_trimmed(line))) return false;
  }
  return check_end();
}

// line = [ "#" anything | word [ value ] ]
bool Parser::parse_line(std::string_view line) {
  if (line.empty() || line[0] == '#') return true;
  const std::string_view word = take_word(line);
  const Directive* directive = find_directive(word);
  if (directive == nullptr) return fail("unknown word " + quoted_word(word));
  return check_place(*directive) && (this->*directive->parse)(line);
}

bool Parser::check_place(const Directive& directive) {
  const zxStr word = quoted_word(directive.word);
  if (directive.place == Place::ahead_of_entries && table.entries.length() > 0)
    return fail(word + " must stand ahead of the first entry");
  if (directive.place == Place::in_record && !is_in_record)
    return fail(word + " must stand below a 'security'");
  return true;
}

// A reader refuses a data file without a record.
bool Parser::check_end() {
  if (table.records.length() > 0) return true;
  if (error.line == 0) error.line = 1;
  return fail("the table has no security with a record");
}

// Notes that a thing is given; one that was given before is an error.
template <class Bits>
bool Parser::claim(Bits& bits, const char* word, std::int32_t index) {
  const Bits bit = Bits{1} << index;
  if ((bits & bit) != 0) return fail(sfmt("# # is given twice", word, index));
  bits |= bit;
  return true;
}

bool Parser::take_index(std::string_view& rest, std::int32_t count,
                        std::int32_t& index) {
  std::int64_t value = 0;
  if (!whole_value(take_word(rest), 0, count - 1, value, error.what))
    return false;
  index = static_cast<std::int32_t>(value);
  return true;
}

// ---- the table

// "codepage" ( "862" | "1255" )
bool Parser::parse_code_page(std::string_view rest) {
  return code_page_value(rest, page, error.what);
}

// "table-date" date
bool Parser::parse_table_date(std::string_view rest) {
  return date_value(rest, table_date, error.what);
}

// "version" whole
bool Parser::parse_version(std::string_view rest) {
  constexpr std::int64_t k_first = 101;
  constexpr std::int64_t k_last = 999;
  std::int64_t version = 0;
  if (!whole_value(rest, k_first, k_last, version, error.what)) return false;
  for (std::size_t i = std::size(table.head.version); i-- > 0; version /= 10)
    table.head.version[i] = static_cast<char>('0' + version % 10);
  return true;
}

// "stamp" whole
bool Parser::parse_stamp(std::string_view rest) {
  std::int64_t stamp = 0;
  if (!whole_value(rest, 0, UINT32_MAX, stamp, error.what)) return false;
  table.head.stamp = static_cast<std::uint32_t>(stamp);
  return true;
}

// ---- entries

bool Parser::check_code(std::int32_t code) {
  const zxStr key = sfmt("#", code);
  if (const std::int32_t* line = lines_of_codes.find(key))
    return fail(sfmt("the code # stands in line # already", code, *line));
  lines_of_codes.set(key, error.line);
  return true;
}

// code [ text ]
bool Parser::add_entry(std::string_view rest, std::int32_t offset) {
  VtxIndexEntry entry = {};
  std::int64_t code = 0;
  zxStr name;
  if (!whole_value(take_word(rest), -k_max_code, k_max_code, code,
                   error.what) ||
      !text_value(rest, page, k_name_room, name, error.what))
    return false;
  entry.code = static_cast<std::int32_t>(code);
  entry.offset = offset;
  name.copy_to(entry.name, sizeof entry.name);
  if (!check_code(entry.code)) return false;
  if (table.entries.length() >= VtxTable::k_max_entries)
    return fail(sfmt("more than # entries", VtxTable::k_max_entries));
  table.entries.append(entry);
  return true;
}

// "security" code [ text ]
bool Parser::parse_security(std::string_view rest) {
  if (!add_entry(rest, vtx_record_offset(table.records.length()))) return false;
  table.records.append(new_record());
  record().date = table_date;
  record().num[0].set_double(table.entries.last().code);
  is_in_record = true;
  given = {};
  return true;
}

// "no-record" code [ text ]
bool Parser::parse_no_record(std::string_view rest) {
  is_in_record = false;
  return add_entry(rest, VtxIndexEntry::k_no_record);
}

// ---- fields

// "type" ( "B" | "I" | "R" )
bool Parser::parse_type(std::string_view rest) {
  if (given.type != 0) return fail("type is given twice");
  given.type = 1;
  for (std::size_t i = 0; i < std::size(k_types); ++i) {
    if (k_types[i] != rest) continue;
    record().type = static_cast<std::int16_t>(i);
    return true;
  }
  return fail(quoted_word(rest) + " is no type: B, I or R");
}

// index [ text ]
bool Parser::add_text(std::string_view rest, VtxCodePage text_page) {
  std::int32_t i = 0;
  zxStr stored;
  if (!take_index(rest, VtxRecord::k_texts, i) ||
      !claim(given.texts, "text", i) ||
      !text_value(rest, text_page, k_text_room, stored, error.what))
    return false;
  stored.copy_to(record().text[i], VtxRecord::k_text_size);
  return true;
}

// "text" index [ text ]
bool Parser::parse_text(std::string_view rest) { return add_text(rest, page); }

// "text-862" index [ text ]
bool Parser::parse_dos_text(std::string_view rest) {
  return add_text(rest, VtxCodePage::dos);
}

// "text-1255" index [ text ]
bool Parser::parse_windows_text(std::string_view rest) {
  return add_text(rest, VtxCodePage::windows);
}

// "num" index number
bool Parser::parse_num(std::string_view rest) {
  std::int32_t i = 0;
  HvlDecimal number;
  if (!take_index(rest, VtxRecord::k_nums, i) || !claim(given.nums, "num", i) ||
      !number_value(rest, number, error.what))
    return false;
  if (i == 0 && number.to_double() != table.entries.last().code)
    return fail("num 0 must be the security's code");
  record().num[i] = number;
  return true;
}

// "date" index date
bool Parser::parse_date(std::string_view rest) {
  std::int32_t i = 0;
  zxDate date;
  if (!take_index(rest, VtxRecord::k_dates, i) ||
      !claim(given.dates, "date", i) || !date_value(rest, date, error.what))
    return false;
  record().dates[i] = date;
  return true;
}

// ---- files

// Makes room for more characters by doubling: append() alone adds little more
// than it needs.
void make_room(zxStr& text, std::int32_t more) {
  const std::int64_t wanted = std::int64_t{text.length()} + more;
  if (wanted <= text.capacity()) return;
  text.reserve(
      static_cast<std::int32_t>(std::min<std::int64_t>(2 * wanted, INT32_MAX)));
}

// All bytes of a file, in blocks.
zxStr read_whole(const zxStr& file_name) {
  constexpr std::int32_t k_block = 49152;
  zxBFile in;
  in.open_or_die(file_name);
  if (!in.is_open()) return {};
  zxStr text;
  zxStr block;
  char* const room = block.buffer(k_block);
  std::int32_t got = 0;
  while (in.read(room, k_block, &got)) {
    make_room(text, got);
    text.append(room, got);
  }
  return text;
}

// A message is cut behind 140 bytes; the folders of the name give way to what
// is wrong.
zxStr shown_name(const zxStr& file_name) {
  constexpr std::int32_t k_longest = 48;
  return file_name.length() > k_longest ? file_part(file_name) : file_name;
}

}  // namespace

bool parse_vtx_text(std::string_view text, VtxTable& table,
                    VtxTextError& error) {
  return Parser(table, error).parse(text);
}

bool load_vtx_text(const zxStr& file_name, VtxTable& table) {
  const zxStr text = read_whole(file_name);
  VtxTextError error;
  if (parse_vtx_text(text.view(), table, error)) return true;
  ZX_HERE;
  bailf("#(#): #", shown_name(file_name), error.line, error.what);
  return false;
}
