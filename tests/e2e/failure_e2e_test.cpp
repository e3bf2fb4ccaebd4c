// failure_e2e_test.cpp - every place of the library that goes on behind a
// dropped failure, in a process that is failing: what is asked of it there
// gives a neutral value and leaves everything as it was, and the process ends
// as it would have.

#include <gtest/gtest.h>

#include <climits>
#include <compare>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "hvldec.h"
#include "kit/cases.h"
#include "kit/failure_road.h"
#include "kit/faults.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "obautil/table_bytes.h"
#include "r9qvtxdb.h"
#include "zxaa.h"
#include "zxatsys.h"
#include "zxbfile.h"
#include "zxdate.h"
#include "zxmainf.h"
#include "zxp2l.h"
#include "zxpkg.h"
#include "zxplat.h"
#include "zxqva.h"
#include "zxsfmt.h"
#include "zxstkdmp.h"
#include "zxstr.h"
#include "zxsys2.h"

namespace {

namespace fs = std::filesystem;

using kit::say;
using kit::screen;
using kit::start;

// ------------------------------------------------------- what is expected --

// A program without a console says "Cleanup Failure" for each failure that is
// dropped, which counts them; one with a console is quiet.
bool counts_drops = false;
int drops = 0;

// Says what went wrong, and nothing otherwise.
void expect(bool good, const char* what) {
  if (!good) say(std::string("wrong: ") + what + "\r\n");
  if (counts_drops && drops == 0)
    say(std::string("no failure: ") + what + "\r\n");
  drops = 0;
}

// The condition holds, and a failure was dropped on the way to it.
#define EXPECT_DROPPED(condition) expect((condition), #condition)

// The call came back, behind a dropped failure, and the condition holds.
#define EXPECT_DROPPED_IN(call, condition) \
  expect((static_cast<void>(call), (condition)), #call)

// For what is done on the way, without a failure.
#define EXPECT_FINE(condition)                                       \
  do {                                                               \
    if (!(condition)) say("wrong on the way: " #condition "\r\n");   \
    if (drops != 0) say("a failure on the way: " #condition "\r\n"); \
    drops = 0;                                                       \
  } while (false)

// Null, for all that the compiler can tell.
template <class T>
T* null_pointer() {
  static T* volatile pointer = nullptr;
  return pointer;
}
const char* null_text() { return null_pointer<const char>(); }

// ---------------------------------------------------------------- strings --

void check_string_bounds() {
  zxStr text("abc");
  EXPECT_DROPPED(text[3] == '\0');
  EXPECT_DROPPED(text[-1] == '\0');
  EXPECT_DROPPED(text[INT32_MAX] == '\0');
  EXPECT_DROPPED_IN(text.at(3) = 'x', text == "abc");
  EXPECT_DROPPED_IN(text.at(-1) = 'x', text == "abc");
  EXPECT_DROPPED_IN(text.at(INT32_MIN) = 'x', text == "abc");
  EXPECT_DROPPED(zxStr()[0] == '\0');
  EXPECT_DROPPED_IN(text.reserve(-1), text == "abc" && text.capacity() == 3);
  EXPECT_DROPPED_IN(text.set_length(-1), text == "abc");
  EXPECT_DROPPED_IN(text.set_length(INT32_MAX), text == "abc");
  EXPECT_DROPPED(text.buffer(-1) == nullptr);
  char room[4] = "???";
  EXPECT_DROPPED_IN(text.copy_to(null_pointer<char>(), 10), text == "abc");
  EXPECT_DROPPED_IN(text.copy_to(room, 3), std::string_view(room) == "???");
  EXPECT_DROPPED_IN(text.copy_to(room, -1), std::string_view(room) == "???");
  EXPECT_FINE(text.append("d") == "abcd");
}

void check_strings_of_null() {
  EXPECT_DROPPED(zxStr(null_text()).length() == 0);
  EXPECT_DROPPED(zxStr(null_text(), 3).length() == 0);
  EXPECT_DROPPED(zxStr("abc", -1).length() == 0);
  EXPECT_DROPPED(zxIStr(null_text()).length() == 0);
  EXPECT_DROPPED(zxIStr(null_text(), 3).length() == 0);
  EXPECT_DROPPED(zxIStr("abc", -1).length() == 0);
  zxStr text("abc");
  const zxStr other = text;
  EXPECT_DROPPED_IN(text = null_text(), text == "abc");
  EXPECT_DROPPED_IN(text.append(null_text()), text == "abc");
  EXPECT_DROPPED_IN(text.append(null_text(), 1), text == "abc");
  EXPECT_DROPPED_IN(text.append("x", -1), text == "abc");
  EXPECT_DROPPED_IN(text += null_text(), text == "abc");
  EXPECT_DROPPED_IN(text.build(null_text(), 1), text == "abc");
  EXPECT_DROPPED_IN(text.build("x", -1), text == "abc");
  EXPECT_DROPPED_IN(text.build("x", 1, null_text(), 1), text == "abc");
  EXPECT_DROPPED_IN(text.build("x", 1, "y", -1), text == "abc");
  EXPECT_DROPPED_IN(text.build("x", INT32_MAX, "y", 1), text == "abc");
  EXPECT_DROPPED(!(text == null_text()));
  EXPECT_DROPPED((text <=> null_text()) == std::strong_ordering::equal);
  EXPECT_DROPPED(text + null_text() == "abc");
  EXPECT_DROPPED(null_text() + text == "abc");
  EXPECT_DROPPED(zxStr("abc") + null_text() == "abc");
  EXPECT_FINE(text.representation() == other.representation());
}

// ----------------------------------------------------------------- arrays --

bool is_a_b(const zxQVA<zxStr>& array) {
  return array.length() == 2 && array.begin()[0] == "a" &&
         array.begin()[1] == "b";
}

void check_array_bounds() {
  zxQVA<zxStr> array;
  array.append("a");
  array.append("b");
  const zxQVA<zxStr>& same = array;
  for (const std::int32_t i : {2, -1, 1000, INT32_MAX, INT32_MIN}) {
    EXPECT_DROPPED(array.get(i).length() == 0);
    EXPECT_DROPPED(same.get(i).length() == 0);
    EXPECT_DROPPED(array.from_top(i).length() == 0);
    EXPECT_DROPPED_IN(array.get(i) = "x", is_a_b(array));
    EXPECT_DROPPED_IN(array.from_top(i) = "x", is_a_b(array));
  }
  EXPECT_DROPPED_IN(array.ref(-1) = "x", is_a_b(array));
  EXPECT_DROPPED_IN(array.set_length(-1), is_a_b(array));
  EXPECT_DROPPED_IN(array.grow_to(-1), is_a_b(array));
  EXPECT_DROPPED_IN(array.slide_to(-1), is_a_b(array));
  EXPECT_DROPPED_IN(array.slide_to(1000), is_a_b(array));
  EXPECT_DROPPED_IN(array.slide_to(INT32_MAX), is_a_b(array));
  EXPECT_DROPPED_IN(array.reserve(-1, 0), is_a_b(array));
  EXPECT_DROPPED_IN(array.reserve(0, -1), is_a_b(array));
  array.append("c");
  EXPECT_FINE(array.length() == 3 && array.last() == "c");
}

void check_array_size() {
  zxQVA<zxStr> array;
  array.append("a");
  array.append("b");
  EXPECT_DROPPED_IN(array.reserve(INT32_MAX, 0), is_a_b(array));
  EXPECT_DROPPED_IN(array.reserve(INT32_MAX, INT32_MAX), is_a_b(array));
  EXPECT_DROPPED_IN(array.grow_to(INT32_MAX), is_a_b(array));
  EXPECT_DROPPED_IN(array.grow_to(INT32_MAX - 1), is_a_b(array));
  EXPECT_DROPPED_IN(array.set_length(INT32_MAX), is_a_b(array));
  EXPECT_DROPPED_IN(array.ref(INT32_MAX) = "x", is_a_b(array));
  array.grow_to(100);
  EXPECT_FINE(array.length() == 101 && array.get(100).length() == 0);
}

void check_empty_array() {
  zxQVA<zxStr> array;
  EXPECT_DROPPED(array.pop_last().length() == 0);
  EXPECT_DROPPED(array.pop_first().length() == 0);
  EXPECT_DROPPED(array.last().length() == 0);
  EXPECT_DROPPED_IN(array.last() = "x", array.length() == 0);
  EXPECT_DROPPED(array.last().length() == 0);
  EXPECT_DROPPED_IN(array.drop_last(), array.length() == 0);
  EXPECT_DROPPED_IN(array.drop_first(), array.length() == 0);
  array.append("a");
  EXPECT_FINE(array.pop_first() == "a");
}

// ----------------------------------------------------------------- tables --

void check_string_table() {
  zxSA<zxStr> table;
  EXPECT_DROPPED(table.at("none").length() == 0);
  table.set("a", "1");
  EXPECT_DROPPED_IN(table.at("none") = "x", table.length() == 1);
  EXPECT_DROPPED(table.at(zxStr("none")).length() == 0);
  EXPECT_DROPPED(table.find(null_text()) == nullptr);
  EXPECT_DROPPED(table.get(null_text()).length() == 0);
  EXPECT_DROPPED_IN(table.erase("none"), table.length() == 1);
  EXPECT_FINE(table.get("a") == "1" && !table.contains("none"));
}

void check_number_table() {
  zxAA<int, zxStr> table;
  EXPECT_DROPPED_IN(table.erase(5), table.length() == 0);
  table.set(7, "seven");
  EXPECT_DROPPED(table.at(5).length() == 0);
  EXPECT_DROPPED_IN(table.at(5) = "x", !table.contains(5));
  EXPECT_DROPPED_IN(table.erase(5), table.length() == 1);
  // 0 is the null key.
  EXPECT_DROPPED(table.find(0) == nullptr);
  EXPECT_DROPPED(table.get(0).length() == 0);
  EXPECT_DROPPED_IN(table.set(0, "x"), table.length() == 1);
  EXPECT_DROPPED_IN(table.ref(0) = "x", table.length() == 1);
  EXPECT_DROPPED_IN(table.erase(0), table.length() == 1);
  EXPECT_FINE(table.at(7) == "seven");
}

// The number of entries of a table, which stands behind a pointer and the
// number of slots.
void write_count(zxAA<int, zxStr>& table, std::int32_t count) {
  std::memcpy(reinterpret_cast<char*>(&table) + sizeof(void*) + 4, &count,
              sizeof count);
}

void check_full_table() {
  zxAA<int, zxStr> table;
  table.set(7, "seven");
  write_count(table, table.slots());
  EXPECT_FINE(table.length() == table.slots());
  EXPECT_DROPPED(table.find(5) == nullptr);
  EXPECT_DROPPED(table.get(5).length() == 0);
  EXPECT_DROPPED_IN(table.set(5, "five"), table.length() == table.slots());
  EXPECT_DROPPED_IN(table.erase(5), table.length() == table.slots());
  write_count(table, 1);
  EXPECT_FINE(table.at(7) == "seven" && !table.contains(5));
}

void check_table_size() {
  zxAA<int, zxStr> table;
  EXPECT_DROPPED_IN(table.grow(INT32_MAX), table.slots() == 0);
  table.set(7, "seven");
  EXPECT_FINE(table.at(7) == "seven" && table.length() == 1);
}

// ---------------------------------------------------------------- formats --

void check_formats() {
  EXPECT_DROPPED(sfmt("# and #", 1) == "1 and #");
  EXPECT_DROPPED(sfmt("ab%q") == "ab%q");
  EXPECT_DROPPED(sfmt("ab", 1) == "ab");
  EXPECT_DROPPED(sfmt("%t", 1) == "%t");
  EXPECT_DROPPED_IN(oprint("lost #"), true);
  EXPECT_DROPPED_IN(eprint("lost #"), true);
  EXPECT_DROPPED_IN(bailf("lost #"), true);
  EXPECT_DROPPED_IN(bailf("a second failure"), true);
  // A null text is an empty one.
  EXPECT_DROPPED(sfmt("<#>", null_text()) == "<>");
}

// ------------------------------------------------------------------ files --

void check_closed_file() {
  zxBFile file;
  char room[4] = "???";
  std::int32_t got = 77;
  EXPECT_DROPPED(!file.read(room, 3));
  EXPECT_DROPPED(!file.read(room, 3, &got) && got == 0);
  EXPECT_DROPPED(!file.read_all(room, 3));
  EXPECT_DROPPED_IN(file.write(room, 3), !file.is_open());
  EXPECT_DROPPED_IN(file.puts("x"), file.lines == 0);
  EXPECT_DROPPED_IN(file.sync(), !file.is_open());
  EXPECT_DROPPED(!file.seek(0));
  EXPECT_DROPPED(!file.seek_end());
  EXPECT_DROPPED(file.tell() == -1);
  EXPECT_FINE(file.close() && std::string_view(room) == "???");
}

void check_open_file() {
  zxBFile file;
  char room[4] = "???";
  file.create("open.txt");
  file.puts("text");
  EXPECT_FINE(file.name == "open.txt" && file.lines == 1);
  EXPECT_DROPPED_IN(file.create("other"), file.name == "open.txt");
  EXPECT_DROPPED(!file.try_create("other") && file.name == "open.txt");
  EXPECT_DROPPED_IN(file.create_new("other"), file.name == "open.txt");
  EXPECT_DROPPED(!file.open("open.txt") && file.lines == 1);
  EXPECT_DROPPED_IN(file.open_or_die("open.txt"), file.lines == 1);
  EXPECT_DROPPED(!file.open_rw("open.txt") && file.lines == 1);
  EXPECT_DROPPED(!file.seek(-1) && file.tell() == 4);
  EXPECT_DROPPED(!file.read(room, -1));
  EXPECT_DROPPED_IN(file.write(room, -1), file.tell() == 4);
  EXPECT_DROPPED(!file.read_all(room, 3));
  EXPECT_FINE(!zxplat::name_taken("other"));
  EXPECT_FINE(file.close() && std::string_view(room) == "???");
  EXPECT_FINE(kit::read_file("open.txt") == "text");
}

void check_files_that_fail() {
  zxBFile file;
  EXPECT_DROPPED_IN(file.create("no\\such\\file"), !file.is_open());
  EXPECT_DROPPED_IN(file.create(""), !file.is_open());
  EXPECT_DROPPED_IN(file.create_new("open.txt"), !file.is_open());
  EXPECT_DROPPED_IN(file.open_or_die("no\\such\\file"), !file.is_open());
  EXPECT_DROPPED(!file.open_rw("-") && !file.is_open());
  file.open("open.txt");
  EXPECT_FINE(file.is_open());
  EXPECT_DROPPED_IN((file.write("x", 1), file.close(no_detail)),
                    !file.is_open());
  static zxStream stream(zxplat::k_stdin_fd);
  zxplat::files.set_mode = [](zxplat::Fd, zxplat::StreamMode) { return false; };
  EXPECT_DROPPED_IN(file.attach("-", stream), !file.is_open());
  zxplat::files.set_mode = zxplat::system_files.set_mode;
  EXPECT_FINE(kit::read_file("open.txt") == "text");
}

// ----------------------------------------------------- files by their name --

void check_unique_names() {
  EXPECT_DROPPED(uniqfile("no\\such", "x").length() > 0);
  zxBFile file;
  for (const char* name : {"TMPDIR", "TMP", "TEMP"})
    kit::set_variable(name, "no-such-folder");
  clear_temp_path();
  EXPECT_DROPPED(unique_temp_name("x").length() > 0);
  EXPECT_DROPPED(create_temp_file(file, "x").length() > 0 && !file.is_open());
  clear_temp_path();
}

bool is_text_alone() {
  return kit::read_file("open.txt") == "text" &&
         !zxplat::name_taken("moved.txt");
}

void check_moving_and_copying() {
  EXPECT_DROPPED_IN(move_file("missing", "moved.txt"), is_text_alone());
  EXPECT_DROPPED_IN(move_file("open.txt", "open.txt"), is_text_alone());
  EXPECT_DROPPED_IN(move_file("open.txt", ".\\open.txt"), is_text_alone());
  EXPECT_DROPPED_IN(move_file("open.txt", "folder"), is_text_alone());
  EXPECT_DROPPED_IN(move_file("open.txt", "no\\such\\x"), is_text_alone());
  EXPECT_DROPPED_IN(cpfile("missing", "moved.txt"), is_text_alone());
  EXPECT_DROPPED_IN(cpfile("open.txt", "no\\such\\x"), is_text_alone());
  EXPECT_DROPPED_IN(delfile("missing"), is_text_alone());
  EXPECT_DROPPED_IN(delfile("folder"), is_text_alone());
  EXPECT_DROPPED_IN(delefile("folder"), is_text_alone());
}

void check_failing_renames() {
  kit::Faults faults;
  faults.fail_all(kit::Call::rename, zxplat::k_err_denied);
  EXPECT_DROPPED_IN(move_file("open.txt", "moved.txt"), is_text_alone());
  EXPECT_DROPPED_IN(cpfile("open.txt", "moved.txt"), is_text_alone());
  // Across devices the copy fails, and the file must stay.
  faults.fail_all(kit::Call::rename, zxplat::k_err_other_device);
  EXPECT_DROPPED_IN(move_file("open.txt", "moved.txt"), is_text_alone());
  faults.fail_all(kit::Call::read);
  EXPECT_DROPPED_IN(move_file("open.txt", "moved.txt"), true);
  EXPECT_DROPPED_IN(cpfile("open.txt", "moved.txt"), true);
}

// ------------------------------------------------- numbers, dates, Hebrew --

void check_hebrew() {
  constexpr char k_ltr_mark[] = "\xFD";
  constexpr char k_rtl_mark[] = "\xFE";
  static constexpr zxLogicalExport cells("");
  char room[16];
  EXPECT_DROPPED(logical_from_phys(k_ltr_mark, true).length() == 0);
  EXPECT_DROPPED(logical_from_phys(k_rtl_mark, false).length() == 0);
  EXPECT_DROPPED(logical_from_phys_lines("ab\r\n\xFD\r\ncd", true) ==
                 "ab\r\n\r\ncd");
  EXPECT_DROPPED(cells.convert(room, k_ltr_mark).empty());
}

void check_dates() {
  for (const int day : {-1, -32768, 32767}) {
    const zxDate date = zxDate::from_stored(static_cast<std::int16_t>(day));
    std::int32_t year = 1, month = 2, number = 3;
    char room[9] = "????????";
    EXPECT_DROPPED(date.to_text().length() == 0);
    EXPECT_DROPPED(!date.get_full(year, month, number) && year == 1 &&
                   month == 2 && number == 3);
    EXPECT_DROPPED(!date.write_text(room) &&
                   std::string_view(room) == "????????");
    EXPECT_DROPPED(sfmt("<#>", date) == "<>");
  }
}

void check_decimals() {
  HvlDecimal number = HvlDecimal::from_word(24);
  for (const auto& [whole, part] :
       {std::pair{1, 64}, {1, -1}, {-1, 1}, {0, -64}, {5, INT32_MAX}})
    EXPECT_DROPPED_IN(number.set_sixty_fourths(whole, part),
                      number.word() == 24);
  for (const std::int32_t value : {10'000, -10'000, INT32_MAX, INT32_MIN})
    EXPECT_DROPPED_IN(number.set_small_int(value), number.word() == 24);
}

// --------------------------------------------------------------- database --

void check_closed_table() {
  VtxRecord record;
  EXPECT_DROPPED(vtx_stamp() == 0);
  EXPECT_DROPPED(vtx_version() == 0);
  EXPECT_DROPPED(vtx_date() == zxDate());
  EXPECT_DROPPED(vtx_count() == 0);
  EXPECT_DROPPED(vtx_name_by_code(1).length() == 0);
  EXPECT_DROPPED(vtx_name_by_index(0).length() == 0);
  EXPECT_DROPPED(vtx_index_of_code(1) == -1);
  EXPECT_DROPPED(vtx_code_by_index(0) == -1);
  EXPECT_DROPPED_IN(vtx_put_record(record), true);
  EXPECT_DROPPED_IN(vtx_rebuild_index(), true);
  EXPECT_FINE(vtx_read_by_index(0, record) == k_vtx_not_open);
  EXPECT_DROPPED(init_vtx("zero") == k_vtx_bad_index);
  EXPECT_DROPPED_IN(vtx_write_index("no\\such\\", nullptr, 1), true);
  EXPECT_DROPPED_IN(vtx_write_index("zero\\", nullptr, 32'768), true);
}

void check_open_table() {
  VtxRecord record;
  std::memset(static_cast<void*>(&record), 'x', sizeof record);
  record.num[0].set_double(999);
  EXPECT_FINE(init_vtx("") == k_vtx_ok);
  EXPECT_DROPPED_IN(vtx_put_record(record), vtx_count() == 2);
  EXPECT_DROPPED(record.text_field(-1).empty());
  EXPECT_DROPPED(record.text_field(VtxRecord::k_texts).empty());
  record.num[0].set_double(2);
  {
    kit::Faults faults;
    faults.fail_all(kit::Call::seek);
    EXPECT_DROPPED_IN(vtx_put_record(record), vtx_count() == 2);
  }
  EXPECT_FINE(vtx_name_by_index(0) == "ONE" && vtx_index_of_code(2) == 1);
  // The record that found no way to the file is told of once more.
  EXPECT_DROPPED_IN(vtx_close(), vtx_has_index(0) == k_vtx_not_open);
}

// -------------------------------------------------------- the process itself

ZxPackage first_package = {"e2e-first", "1", "c", 0, nullptr};
ZxPackage second_package = {"e2e-second", "1", "c", 0, nullptr};
ZxPackage newer_package = {"e2e-first", "2", "c", 0, nullptr};
ZxPackage linked_package = {"e2e-linked", "1", "c", 0, &second_package};

void check_packages() {
  register_package(&first_package);
  register_package(&second_package);
  const zxStr before = packages_long();
  EXPECT_FINE(before.length() > 0);
  EXPECT_DROPPED_IN(register_package(&first_package),
                    packages_long() == before);
  EXPECT_DROPPED_IN(register_package(&newer_package),
                    packages_long() == before);
  EXPECT_DROPPED_IN(register_package(&linked_package),
                    packages_long() == before);
}

class Marker : public zxFrameMarker {
 public:
  zxStr describe() const override { return "marker"; }
};

void check_frame_markers() {
  const zxFrameMarker* const before = frame_markers;
  {
    Marker outer;
    Marker inner;
    EXPECT_DROPPED_IN(pop_frame_marker(&outer),
                      frame_markers == &inner && inner.next == before);
    // It is gone already when its destructor comes.
  }
  EXPECT_DROPPED(frame_markers == before);
}

void nothing() {}

void check_process() {
  const zxStr path = program_path;
  const char* const arguments[] = {"other", "a", "b"};
  EXPECT_DROPPED_IN(init_zxlib_args(3, arguments),
                    program_path == path && g_args.length() == 0);
  EXPECT_DROPPED(at_emergency(nothing, nothing) == nothing);
  EXPECT_DROPPED(at_emergency(nullptr, nothing) == nullptr);
  zxMathError record = {1, "sqrt", 1, 2, 3};
  EXPECT_DROPPED(math_error(record) == 0 && record.result == 3);
}

// ------------------------------------------------------------ the process --

void check_everything() {
  const std::uint32_t before = traits;
  if (counts_drops) traits &= ~k_trait_console;
  zxplat::process.last_words = [](const char* text) {
    drops += std::string_view(text) == "Cleanup Failure" ? 1 : 1000;
  };
  for (void (*check)() :
       {check_string_bounds,   check_strings_of_null, check_array_bounds,
        check_array_size,      check_empty_array,     check_string_table,
        check_number_table,    check_full_table,      check_table_size,
        check_formats,         check_closed_file,     check_open_file,
        check_files_that_fail, check_unique_names,    check_moving_and_copying,
        check_failing_renames, check_hebrew,          check_dates,
        check_decimals,        check_closed_table,    check_open_table,
        check_packages,        check_frame_markers,   check_process})
    check();
  traits = before;
  zxplat::process.last_words = zxplat::system_process.last_words;
  say("checked everything");
}

ZX_CASE(failure_e2e_goes_on) {
  start();
  counts_drops = argc > 1;
  at_emergency(check_everything, nullptr);
  for (std::size_t i = 1; i < k_max_emergencies; ++i)
    at_emergency(nullptr, nullptr);
  zxplat::set_last_error(0);
  bail_code(1010, "the first", BailDetail(7, "and only"));
  return 0;
}

void expect_to_go_on(const std::vector<std::string>& arguments) {
  using namespace table_bytes;
  const kit::TempDir folder;
  fs::create_directory(folder.file("folder"));
  fs::create_directory(folder.file("zero"));
  kit::write_file(folder.file("zero/D4WVTX.IDX"), index_head(0));
  const std::string index =
      index_bytes({{"ONE", 1, offset_of(0)}, {"TWO", 2, offset_of(1)}});
  const std::string data = data_bytes({security(1, "one"), security(2, "two")});
  kit::write_file(folder.file("D4WVTX.IDX"), index);
  kit::write_file(folder.file("D4WVTX.BIN"), data);
  kit::ProcessOptions options;
  options.directory = folder.path();
  options.variables = {{"ZX_BOX_OUT", folder.file("box")}};
  kit::expect_end(kit::run_case("failure_e2e_goes_on", arguments, options),
                  "checked everything" +
                      screen("1010: close: 'the first' failed (7: and only)",
                             "[1010-1010-7/0-0/0/the first/and only]"));
  EXPECT_FALSE(fs::exists(folder.file("box")));
  EXPECT_NE(kit::read_file(folder.file("P.dmp"))
                .find("@ERR:1010: close: 'the first' failed (7: and only) "),
            std::string::npos);
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.IDX")), index);
  EXPECT_EQ(kit::read_file(folder.file("D4WVTX.BIN")), data);
  EXPECT_EQ(kit::read_file(folder.file("zero/D4WVTX.IDX")), "");
}

TEST(failure_e2e, all_that_is_asked_of_a_failing_process_comes_back) {
  expect_to_go_on({});
}

TEST(failure_e2e, each_place_that_goes_on_has_dropped_a_failure) {
  expect_to_go_on({"count"});
}

}  // namespace
