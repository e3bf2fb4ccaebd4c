// zxatsys_test.cpp - tests of zxlib/zxatsys.h, zxatsys_impl.h, zxatsys.cpp and
// zxatsys_messages.cpp: message, diagnostic line, process end.  Hooks, boxes
// and emergencies are in zxatsys_road_test.cpp, faults in
// zxatsys_faults_test.cpp, the printed report in zxatsys_report_test.cpp.

#include "zxatsys.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <climits>
#include <cstdlib>
#include <functional>
#include <iterator>
#include <map>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "kit/tempdir.h"
#include "zxatsys_impl.h"
#include "zxplat.h"
#include "zxsfmt.h"

namespace {

using kit::Recorder;
using namespace std::string_literals;
using namespace std::string_view_literals;

// -------------------------------------------------- the table of messages --

// The test's own copy of the table.  The rows 3100 to 3104 are Hebrew in code
// page 862, in display order.
// clang-format off
constexpr struct { std::int32_t number; const char* text; } k_rows[] = {
    {1000, "bailed out: %s "},
    {1001, "exception"},
    {1002, "open: Can't open file '%s' for reading"},
    {1003, "create: File already open"},
    {1004, "create: Can't open file '%s' for writing"},
    {1005, "open_rw: File already open '%s'"},
    {1006, "open_rw: Can't open file '%s' for read/write"},
    {1007, "get_name: File not open"},
    {1008, "open: Can't open file '%s' for mode i/o"},
    {1009, "open: File '%s' already open"},
    {1010, "close: '%s' failed"},
    {1011, "fastio: '%s' failed"},
    {1012, "seek: operation failed"},
    {1013, "getpos: operation failed"},
    {1014, "read: '%s' operation failed"},
    {1015, "hread: operation failed"},
    {1016, "write: failed on '%s'"},
    {1017, "hwrite: operation failed"},
    {1018, "filelength: operation failed"},
    {1019, "filelength: operation failed"},
    {1020, "flush: '%s' operation failed"},
    {1021, "lock: '%s' operation failed"},
    {1022, "unlock: '%s' operation failed"},
    {1023, "chsize: operation failed"},
    {1024, "puts: file not opened"},
    {1025, "gets: file not opened"},
    {1026, "delfile: cant del '%s'"},
    {1027, "delefile: cant del '%s'"},
    {1028, "diskfree: bad drive"},
    {1029, "gets: file error (%s)"},
    {1030, "createdir: failed '%s'"},
    {1031, "del dir: failed '%s'"},
    {1032, "chg dir: failed '%s'"},
    {1033, "lock: bad file/flush '%s'"},
    {1034, "cpfiles2dir: bad dir name '%s'"},
    {1035, "mvfiles2dir: bad dir name '%s'"},
    {1036, "mvfile: rename fail on '%s'"},
    {1037, "uniqfile: failed to find on '%s'"},
    {1038, "cpfile: failed to rename tmp to '%s'"},
    {1040, "unique id err"},
    {1092, "unlock: '%s' file error"},
    {1100, "sys: failed on '%.140s'"},
    {1101, "sys: failed on '%.140s'"},
    {1102, "stop threads: tasks still active"},
    {1103, "check threads: stack overflow"},
    {1104, "switch threads: stack overflow"},
    {1105, "term thread: cant stop thread zero"},
    {1106, "alloc thread: no mem or thread space"},
    {1107, "alloc thread: compiler err"},
    {1108, "init threads: no mem"},
    {1200, "=user break"},
    {1201, "open port: already open"},
    {1202, "clrio port: not open"},
    {1203, "clri port: not open"},
    {1204, "cdoff port: not open"},
    {1205, "dtrrts port: not open"},
    {1206, "sendbyte port: not open"},
    {1207, "recvbytec port: not open"},
    {1208, "recvbyteb port: not open"},
    {1209, "txfree port: not open"},
    {1210, "rxused port: not open"},
    {1211, "setspeed port: not open"},
    {1212, "setbsize port: not open"},
    {1213, "chklerr port: not open"},
    {1214, "open port: illegal port"},
    {1260, "port: internal"},
    {1300, "vector: illegal size"},
    {1301, "vector: index overflow"},
    {1302, "C vector: index overflow"},
    {1303, "matrix: index overflow"},
    {1400, "valcmps: index overflow"},
    {1500, "hwin: bad color"},
    {1501, "hwin: toobig menu"},
    {1600, "hash: bad val"},
    {1601, "hash: tbl full"},
    {1602, "hash: elem exist"},
    {1603, "hash: bad val"},
    {1701, "hwin create: already active"},
    {1702, "hwin create: bad wsize"},
    {1703, "hwin create: out of space"},
    {1704, "hwin erase: no win"},
    {1705, "hwin init: no sapce"},
    {1706, "hwin setpage: has popup"},
    {1707, "hwin drawarea: bad area"},
    {1711, "grscr restore: cannot read file"},
    {1712, "grscr restore: cannot delete file"},
    {1713, "scr restore: cannot delete file"},
    {1714, "grscr insline: cannot calc imagesize"},
    {1715, "grscr insline: no mem"},
    {1716, "grscr delline: cannot calc imagesize"},
    {1717, "grscr delline: no mem"},
    {1718, "grscr putch: no font info"},
    {1720, "hwin erase: wrong win"},
    {1721, "zxscr saveimage: cannot calc imagesize"},
    {1722, "GrrScr saveimage: can't save to disk"},
    {1723, "scr saveimage: no mem"},
    {1724, "scr restoreimage: no mem"},
    {1725, "scr save: no mem"},
    {1726, "scr restore: no mem"},
    {1727, "scr toggle_lines: fullscreen is not active"},
    {1728, "scr toggle_lines: not a vga adaptor"},
    {1729, "scr toggle_lines: screen lines other than 25,28,43,50"},
    {1730, "hwin create: no screen"},
    {1731, "grscr save screen: cannot save to file"},
    {1732, "grscr restore screen: cannot read file"},
    {1733, "grscr restore screen: cannot delete file"},
    {1734, "scr save screen: already saved"},
    {1735, "scr restore screen: no screen saved"},
    {1736, "grscr save screen: already saved"},
    {1737, "grscr restore screen: no screen saved"},
    {1738, "grscr gputch: char not digit in tiny font"},
    {1739, "scr destroy: cant set pre init lines"},
    {1751, "regcomp: too big"},
    {1752, "regcomp: bad reg '%.140s'"},
    {1753, "regexec: bad args"},
    {1754, "regexec: bad reg"},
    {1801, "setdate: bad date"},
    {1803, "settime: bad time (#)"},
    {1900, "ptrdiff: too big"},
    {2000, "malloc: out of mem"},
    {2001, "xmsalloc: out of mem"},
    {2004, "TEMP: cant set temp dir"},
    {2005, "fgets: read ovr 32k (%s)"},
    {2006, "fmt err (%.140s)"},
    {2007, "sys err"},
    {2008, "mem info: bad heap"},
    {2009, "bad dos mem. please reboot"},
    {2021, "malloc: heap fail"},
    {2022, "malloc: tot overflow"},
    {2023, "malloc: blk overflow"},
    {2030, "exp error (at#) %s"},
    {2031, "exp: internal err"},
    {2032, "exp: internal err"},
    {2033, "exp:  sfmt bad parm"},
    {2034, "exp: internal err"},
    {2035, "exp: internal err"},
    {2100, "vra: file sz > allocated"},
    {2101, "vra: bad file read"},
    {2102, "vra: file read miss"},
    {2201, "zxaa: tbl too big"},
    {2202, "zxaa: no such element"},
    {2203, "zxsa: no such element '%.140s'"},
    {2204, "zxaa: no such element to erase"},
    {2205, "zxva: tbl too big"},
    {2300, "unpack: str too short"},
    {2301, "binshift: str too short"},
    {2400, "conf err: %.140s"},
    {2500, "ddeServ: recursive fill_setval"},
    {2501, "ddeServ: dde low memory"},
    {2502, "ddeServ: command too long"},
    {2505, "ddeServ: server already init: %s"},
    {2506, "ddeServ: unable to init: %s"},
    {2510, "ddeCli: Unknown error"},
    {2511, "ddeCli: dde internal err, windows unstable"},
    {2512, "ddeCli: client init fail (%s)"},
    {2513, "ddeCli: user failed to free last request"},
    {2514, "ddeCli: win.ini server (%s) startup fail"},
    {3000, "general math err (829=NAN/bad op 835=flt stk ovrflow)"},
    {3001, "int divide by zero"},
    {3002, "float div by zero"},
    {3003, "float ovrflow"},
    {3004, "math func"},
    {3005, "bad env"},
    {3006, "bad compiler"},
    {3100,
     "%s (\225\201\205\227) \204\214\201\210 \204\200\226\216\220 \200\214"},
    {3101, "\211\205\202\231 %s \204\203\231 \215\231"},
    {3102, "\211\205\202\231 \204\203\231 \230\224\221\216"},
    {3103, "unimplemented FG feature"},
    {3104, "\227\211\230 \221\224\205\210"},
    {3105, "failed loading form: %s"},
    {3106, "no records for picklist"},
    {3107, "form %s already loaded"},
    {3108, "tbl %s must be sorted in order to use rec_no"},
    {3109, "illegal form name: %s"},
    {3110, "bad form: %s"},
    {4001, "out of resources"},
    {4002, "draw bitmap: bad rect"},
    {4003, "StretchBlt failed"},
    {4004, "BitBlt failed"},
    {4005, "RestoreDC failed"},
    {4006, "load bitmap resource %s failed"},
    {4007, "load bitmap resource %d failed"},
    {4008, "read bmp file %s failed"},
    {4009, "read ico file %s failed"},
    {4010, "load bitmap %s failed"},
    {4011, "end gdi obj in use"},
    {4012, "bitmap get_dib() malloc failed"},
};
// clang-format on

TEST(zxatsys, the_table_has_exactly_its_187_rows) {
  ASSERT_EQ(std::size(k_rows), 187U);
  std::map<std::int32_t, std::string> rows;
  for (const auto& row : k_rows) rows[row.number] = row.text;
  ASSERT_EQ(rows.size(), 187U);
  for (std::int32_t number = -100; number <= 70'000; ++number) {
    const char* found = find_bail_message(number);
    const auto expected = rows.find(number);
    ASSERT_EQ(found != nullptr, expected != rows.end()) << number;
    if (found == nullptr) continue;
    EXPECT_EQ(found, expected->second) << number;
  }
  for (const std::int32_t number : {INT32_MIN, INT32_MAX, 1000 + 65536 * 16})
    EXPECT_EQ(find_bail_message(number), nullptr) << number;
}

// What a row shows for a text, by plain search and replace.
std::string shown(std::string row, const std::string& text) {
  const auto put = [&row](const std::string& place, const std::string& with) {
    const std::size_t at = row.find(place);
    if (at == std::string::npos) return false;
    row.replace(at, place.size(), with);
    return true;
  };
  put("%.140s", text.substr(0, 140)) || put("%s", text) || put("%d", text);
  return row;
}

// A row whose text begins with "=" is shown in a way of its own.
bool is_plain(std::string_view row) { return !row.starts_with('='); }

TEST(zxatsys, every_row_shows_its_text_in_its_place) {
  // More than any cut, with all that a formatter would take for its own.
  const std::string text = "%s%n%d" + std::string(194, 'x');
  for (const auto& row : k_rows) {
    if (!is_plain(row.text)) continue;
    SCOPED_TRACE(row.number);
    const std::string number = std::to_string(row.number);
    EXPECT_FAILURE(bail_code(row.number, text.c_str()),
                   number + ": " + shown(row.text, text),
                   "[" + number + "-" + number + "-0/E-0/E/%s%n%dxxxxxx/]");
  }
}

TEST(zxatsys, a_row_without_a_text_shows_an_empty_one) {
  for (const auto& row : k_rows) {
    if (!is_plain(row.text)) continue;
    SCOPED_TRACE(row.number);
    const std::string number = std::to_string(row.number);
    EXPECT_FAILURE(bail_code(row.number), number + ": " + shown(row.text, ""),
                   "[" + number + "-" + number + "-0/E-0/E//]");
  }
}

// ------------------------------------------------------- message and line --

TEST(zxatsys, numbers_and_texts_make_message_and_line) {
  const struct {
    std::int32_t number;
    const char* text;
    std::string message;
    std::string line;
  } rows[] = {
      {1000, "here:5", "1000: bailed out: here:5 ",
       "[1000-1000-0/E-0/E/here:5/]"},
      {1002, "a.txt", "1002: open: Can't open file 'a.txt' for reading",
       "[1002-1002-0/E-0/E/a.txt/]"},
      // A row without a place for the text shows it in the line alone.
      {1012, "a.txt", "1012: seek: operation failed",
       "[1012-1012-0/E-0/E/a.txt/]"},
      {4007, "77", "4007: load bitmap resource 77 failed",
       "[4007-4007-0/E-0/E/77/]"},
      {4007, "%d", "4007: load bitmap resource %d failed",
       "[4007-4007-0/E-0/E/%d/]"},
      {2030, "x", "2030: exp error (at#) x", "[2030-2030-0/E-0/E/x/]"},
      // Numbers without a row.
      {9999, nullptr, "9999: ", "[9999-9999-0/E-0/E//]"},
      {9999, "", "9999: ", "[9999-9999-0/E-0/E//]"},
      {9999, "what", "9999: what", "[9999-9999-0/E-0/E/what/]"},
      {2206, nullptr, "2206: ", "[2206-2206-0/E-0/E//]"},
      {500, nullptr, "500: ", "[500-500-0/E-0/E//]"},
      {501, nullptr, "501: ", "[501-501-0/E-0/E//]"},
      {1, nullptr, "1: ", "[1-1-0/E-0/E//]"},
      {-5, nullptr, "-5: ", "[-5--5-0/E-0/E//]"},
      {INT32_MIN, "x", "-2147483648: x",
       "[-2147483648--2147483648-0/E-0/E/x/]"},
      // Free texts have the number 0.
      {0, nullptr, "0:!", "[0-0-0/E-0/E//]"},
      {0, "", "", "[0-0-0/E-0/E//]"},
      {0, "free", "free", "[0-0-0/E-0/E/free/]"},
      {0, "100%", "100%", "[0-0-0/E-0/E/100%/]"},
      {0, "%s %d %n", "%s %d %n", "[0-0-0/E-0/E/%s %d %n/]"},
      {0, "0123456789ab", "0123456789ab", "[0-0-0/E-0/E/0123456789ab/]"},
      {0, "0123456789abc", "0123456789abc", "[0-0-0/E-0/E/0123456789ab/]"},
      {0, "\xF9\xEC\xE5\xED", "\xF9\xEC\xE5\xED",
       "[0-0-0/E-0/E/\xF9\xEC\xE5\xED/]"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.message + " " + row.line);
    EXPECT_FAILURE(bail_code(row.number, row.text), row.message, row.line);
  }
}

TEST(zxatsys, free_texts_are_cut_to_140_bytes) {
  for (const std::int32_t number : {0, 9999}) {
    const std::string head = number == 0 ? "" : std::to_string(number) + ": ";
    for (const std::size_t length : {139U, 140U, 141U, 200U}) {
      SCOPED_TRACE(length);
      std::string text(length, 'x');
      text.back() = '!';
      const std::string number_text = std::to_string(number);
      EXPECT_FAILURE(
          bail_code(number, text.c_str()), head + text.substr(0, 140),
          "[" + number_text + "-" + number_text + "-0/E-0/E/xxxxxxxxxxxx/]");
    }
  }
}

TEST(zxatsys, texts_of_rows_are_whole_unless_the_row_cuts) {
  const std::string text(200, 'x');
  EXPECT_FAILURE(bail_code(1010, text.c_str()),
                 "1010: close: '" + text + "' failed",
                 "[1010-1010-0/E-0/E/xxxxxxxxxxxx/]");
  EXPECT_FAILURE(bail_code(2006, text.c_str()),
                 "2006: fmt err (" + text.substr(60) + ")",
                 "[2006-2006-0/E-0/E/xxxxxxxxxxxx/]");
}

TEST(zxatsys, details_stand_behind_the_message) {
  constexpr auto k_long = "a text of thirty bytes, no less";
  const struct {
    BailDetail detail;
    std::string added;
    std::string line;
  } rows[] = {
      {no_detail, "", "[1012-1012-0/E-0/E//]"},
      {BailDetail(), "", "[1012-1012-0/E-0/E//]"},
      {BailDetail(0), "", "[1012-1012-0/E-0/E//]"},
      {BailDetail(7), " (7)", "[1012-1012-7/E-0/E//]"},
      {BailDetail(-7), " (-7)", "[1012-1012--7/E-0/E//]"},
      {BailDetail(7, "why"), " (7: why)", "[1012-1012-7/E-0/E//why]"},
      {BailDetail(0, "why"), " (why)", "[1012-1012-0/E-0/E//why]"},
      {BailDetail(0, "100%s"), " (100%s)", "[1012-1012-0/E-0/E//100%s]"},
      {BailDetail(INT32_MIN, k_long),
       " (-2147483648: a text of thirty bytes, no less)",
       "[1012-1012--2147483648/E-0/E//a text of thirty b]"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.line);
    EXPECT_FAILURE(bail_detail(1012, row.detail),
                   "1012: seek: operation failed" + row.added, row.line);
  }
}

TEST(zxatsys, every_entry_passes_on_what_it_was_given) {
  const BailDetail detail(3, "d");
  EXPECT_FAILURE(bail_code(1013), "1013: getpos: operation failed",
                 "[1013-1013-0/E-0/E//]");
  EXPECT_FAILURE(bail_code(1010, "f", detail), "1010: close: 'f' failed (3: d)",
                 "[1010-1010-3/E-0/E/f/d]");
  EXPECT_FAILURE(bail_detail(1010, "f", detail),
                 "1010: close: 'f' failed (3: d)", "[1010-1010-3/E-0/E/f/d]");
  EXPECT_FAILURE(bail_detail(1010, detail), "1010: close: '' failed (3: d)",
                 "[1010-1010-3/E-0/E//d]");
  EXPECT_FAILURE(bail_detail(0, detail), "0:! (3: d)", "[0-0-3/E-0/E//d]");
  EXPECT_FAILURE(bail_detail(9999, detail), "9999:  (3: d)",
                 "[9999-9999-3/E-0/E//d]");
}

// ------------------------------------------------------------- the screen --

// What a failure prints, with this system error as the last one.
std::string screen_of(int error, const std::function<void()>& statement) {
  return kit::failure_of([&] {
           zxplat::set_last_error(error);
           statement();
         })
      .screen;
}

TEST(zxatsys, the_line_shows_the_last_system_error_twice) {
  EXPECT_EQ(screen_of(5, [] { bail_code(1014, "a"); }),
            "\r\nprog v1 Fatal Error 1014: read: 'a' operation failed "
            "[1014-1014-0/5-0/5/a/]\r\n");
  EXPECT_EQ(screen_of(1234, [] { bail_code(0, "a"); }),
            "\r\nprog v1 Fatal Error a [0-0-0/1234-0/1234/a/]\r\n");
}

// The line has 27 bytes: "[0-0-0/0-0/0/", twelve of the text, "/]".
TEST(zxatsys, message_and_line_below_65_bytes_together_share_a_line) {
  const std::string line = "[0-0-0/0-0/0/xxxxxxxxxxxx/]";
  ASSERT_EQ(line.size(), 27U);
  const struct {
    std::size_t length;  // of the message
    const char* between;
  } rows[] = {
      {36, " "},
      {37, " "},                // 64 together
      {38, "\r\n           "},  // 65
      {39, "\r\n           "},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.length);
    const std::string text(row.length, 'x');
    EXPECT_EQ(screen_of(0, [&] { bail_code(0, text.c_str()); }),
              "\r\nprog v1 Fatal Error " + text + row.between + line + "\r\n");
  }
}

TEST(zxatsys, an_assertion_on_one_line_has_two_blanks) {
  EXPECT_EQ(screen_of(0, [] { assert_fail(55, "zxstr"); }),
            "\r\nprog v1 Fatal Error 1000: bailed out: zxstr:55  "
            "[1000-1000-0/0-0/0/zxstr:55/]\r\n");
}

TEST(zxatsys, texts_of_ten_thousand_bytes_are_shown_whole) {
  const std::string text(10'000, 'x');
  EXPECT_EQ(screen_of(0, [&] { bail_code(1010, text.c_str()); }),
            "\r\nprog v1 Fatal Error 1010: close: '" + text +
                "' failed\r\n           "
                "[1010-1010-0/0-0/0/xxxxxxxxxxxx/]\r\n");
  const std::string detail(3000, 'd');
  EXPECT_EQ(screen_of(0,
                      [&] {
                        bail_code(1010, text.c_str(),
                                  BailDetail(7, detail.c_str()));
                      }),
            "\r\nprog v1 Fatal Error 1010: close: '" + text +
                "' failed (7: " + detail +
                ")\r\n           "
                "[1010-1010-7/0-0/0/xxxxxxxxxxxx/dddddddddddddddddd]\r\n");
}

TEST(zxatsys, an_empty_format_is_an_empty_message) {
  EXPECT_EQ(screen_of(0, [] { bailf(""); }),
            "\r\nprog v1 Fatal Error  [0-0-0/0-0/0//]\r\n");
}

// The line is empty then, and what stands between it and the message is
// there all the same.
TEST(zxatsys, a_message_that_begins_with_an_equals_sign_has_no_line) {
  const struct {
    std::int32_t number;
    const char* text;
    BailDetail detail;
    std::string message;
  } rows[] = {
      {1200, nullptr, {}, "1200:  user break"},
      {1200, "unused", {}, "1200:  user break"},
      {1200, nullptr, {7, "why"}, "1200:  user break (7: why)"},
      {1200, nullptr, {-1}, "1200:  user break (-1)"},
      {0, "=abc", {}, " abc"},
      {0, "=", {}, " "},
      {0, "==", {}, " ="},
      {0, "=", {7}, "  (7)"},
      {0, "=", {0, "=why"}, "  (=why)"},
      {0, "=[0-0-0/0-0/0//]", {}, " [0-0-0/0-0/0//]"},
      {9999, "=abc", {}, "9999:  abc"},
      {-1, "=%s", {}, "-1:  %s"},
      // A row that begins with its text.
      {3100,
       "=abc",
       {},
       "3100:  abc (\225\201\205\227) \204\214\201\210 "
       "\204\200\226\216\220 \200\214"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.message);
    const kit::Failure failure =
        kit::failure_of([&] { bail_code(row.number, row.text, row.detail); });
    EXPECT_EQ(failure.exit_code, 100);
    EXPECT_EQ(failure.screen,
              "\r\nprog v1 Fatal Error " + row.message + " \r\n");
    EXPECT_EQ(failure.dumps, std::vector{row.message + " "});
  }
}

TEST(zxatsys, an_equals_sign_elsewhere_means_nothing) {
  EXPECT_FAILURE(bail_code(0, " =abc"), " =abc", "[0-0-0/E-0/E/ =abc/]");
  EXPECT_FAILURE(bail_code(0, nullptr, BailDetail(0, "=abc")), "0:! (=abc)",
                 "[0-0-0/E-0/E//=abc]");
  EXPECT_FAILURE(bail_code(9999, nullptr, BailDetail(0, "=abc")),
                 "9999:  (=abc)", "[9999-9999-0/E-0/E//=abc]");
  EXPECT_FAILURE(bail_code(2006, "=abc"), "2006: fmt err (=abc)",
                 "[2006-2006-0/E-0/E/=abc/]");
}

TEST(zxatsys, an_empty_line_goes_behind_65_bytes_on_a_line_of_its_own) {
  const std::string text(64, 'x');  // and a blank
  EXPECT_EQ(screen_of(0, [&] { bail_code(0, ("=" + text.substr(1)).c_str()); }),
            "\r\nprog v1 Fatal Error  " + text.substr(1) + " \r\n");
  EXPECT_EQ(screen_of(0, [&] { bail_code(0, ("=" + text).c_str()); }),
            "\r\nprog v1 Fatal Error  " + text + "\r\n           \r\n");
}

// However much of the message is lost, what is shown of it is right and the
// line stands behind it.
TEST(zxatsys, texts_of_any_length_are_shown_in_bounds) {
  const std::string text(100'000, 'x');
  const std::string detail(100'000, 'd');
  for (const bool with_detail : {false, true}) {
    const std::string screen = screen_of(0, [&] {
      bail_code(1010, text.c_str(),
                with_detail ? BailDetail(7, detail.c_str()) : no_detail);
    });
    const std::string line =
        with_detail ? "[1010-1010-7/0-0/0/xxxxxxxxxxxx/dddddddddddddddddd]"
                    : "[1010-1010-0/0-0/0/xxxxxxxxxxxx/]";
    const std::string head = "\r\nprog v1 Fatal Error ";
    const std::string end = "\r\n           " + line + "\r\n";
    ASSERT_TRUE(screen.starts_with(head)) << screen.substr(0, 80);
    ASSERT_TRUE(screen.ends_with(end)) << screen.substr(screen.size() - 80);
    const std::string message =
        screen.substr(head.size(), screen.size() - head.size() - end.size());
    const std::string whole =
        "1010: close: '" + text + "' failed (7: " + detail + ")";
    EXPECT_EQ(message, whole.substr(0, message.size()));
    EXPECT_GT(message.size(), 10'000U);
  }
}

// ------------------------------------------ order, clock, guard, by seams --

std::vector<std::string> events_of_message_12() {
  return {
      "print \r\npath vers Fatal Error 1012: seek: operation failed "
      "[1012-1012-0/0-0/0//]",
      "dump 1012: seek: operation failed [1012-1012-0/0-0/0//]", "break",
      "print \r\n", "exit 100"};
}

TEST(zxatsys, a_failure_is_printed_stands_two_seconds_and_ends_the_process) {
  // Two seconds are over when the clock has moved by two.
  for (const std::int64_t start_ms : {0, 1, 500, 998, 1'700'000'000}) {
    SCOPED_TRACE(start_ms);
    Recorder recorder(start_ms);
    zxplat::set_last_error(0);
    bail_code(1012);
    ASSERT_EQ(recorder.events, events_of_message_12());
    const std::int64_t start = (start_ms + 1) / 1000;  // at the first look
    EXPECT_EQ(recorder.event_seconds,
              (std::vector{start_ms / 1000, start_ms / 1000, start_ms / 1000,
                           start + 2, start + 2}));
    EXPECT_TRUE(recorder.slept) << "a wait that burns the processor";
  }
}

TEST(zxatsys, the_wait_is_two_seconds_unless_a_test_shortens_it) {
  EXPECT_EQ(bail_wait_seconds, 2);
  const Recorder recorder(1'000'000);
  bail_wait_seconds = 0;
  bail_code(1012);
  bail_wait_seconds = 2;
  EXPECT_EQ(recorder.event_seconds, (std::vector<std::int64_t>(5, 1000)));
}

TEST(zxatsys, a_failure_while_one_is_shown_is_dropped) {
  Recorder recorder;
  zxplat::set_last_error(0);
  recorder.at_print = [] {
    bail_code(1002, "second");
    bail_detail(1010, "second", BailDetail(1, "d"));
    assert_fail(77, "second");
    EXPECT_FALSE(ZX_ASSERT(false));
  };
  bail_code(1012);
  EXPECT_EQ(recorder.events, events_of_message_12());
}

TEST(zxatsys, a_failure_on_the_way_out_is_dropped) {
  Recorder recorder;
  zxplat::set_last_error(0);
  bool carried_on = false;
  recorder.at_exit = [&] {
    bail_code(1002, "second");
    carried_on = true;
  };
  bail_code(1012);
  EXPECT_TRUE(carried_on);
  EXPECT_EQ(recorder.events, events_of_message_12());
}

TEST(zxatsys, the_guard_stays_set_behind_a_failure) {
  const Recorder recorder;
  EXPECT_FALSE(bail_guard);
  bail_code(1012);
  EXPECT_TRUE(bail_guard);
  bail_code(1013);
  assert_fail(1, "later");
  EXPECT_EQ(recorder.events.size(), 5U);
  EXPECT_TRUE(bail_guard);
}

// The position text lies in a static buffer that a further assertion would
// overwrite.
TEST(zxatsys, a_dropped_assertion_leaves_the_shown_position_alone) {
  Recorder recorder;
  zxplat::set_last_error(0);
  recorder.at_print = [] { assert_fail(99, "other"); };
  assert_fail(55, "zxstr");
  EXPECT_EQ(recorder.events.at(0),
            "print \r\npath vers Fatal Error 1000: bailed out: zxstr:55  "
            "[1000-1000-0/0-0/0/zxstr:55/]");
  EXPECT_STREQ(zx_pos.file, "zxstr");
  EXPECT_EQ(zx_pos.line, 55);
}

TEST(zxatsys, paths_and_versions_of_any_length_are_shown_in_bounds) {
  Recorder recorder;
  static const std::string path(100'000, 'p');
  bail_hooks.program_path = [] { return path.c_str(); };
  bail_hooks.program_version = [] { return path.c_str(); };
  zxplat::set_last_error(0);
  bail_code(1012);
  ASSERT_EQ(recorder.events.size(), 5U);
  EXPECT_TRUE(recorder.events[0].starts_with("print \r\npppppppp"));
  EXPECT_TRUE(recorder.events[0].ends_with(
      " Fatal Error 1012: seek: operation failed [1012-1012-0/0-0/0//]"));
  EXPECT_EQ(recorder.events[3], "print \r\n");
  EXPECT_EQ(recorder.events[4], "exit 100");
}

// ------------------------------------------------------------- assertions --

TEST(zxatsys, assert_fail_stores_the_position) {
  EXPECT_FAILURE(assert_fail(77, "zxfoo"), "1000: bailed out: zxfoo:77 ",
                 "[1000-1000-0/E-0/E/zxfoo:77/]");
  EXPECT_STREQ(zx_pos.file, "zxfoo");
  EXPECT_EQ(zx_pos.line, 77);
}

TEST(zxatsys, assert_fail_takes_any_file_name) {
  EXPECT_FAILURE(assert_fail(3, nullptr), "1000: bailed out: ?:3 ",
                 "[1000-1000-0/E-0/E/?:3/]");
  EXPECT_FAILURE(assert_fail(3, "abcdefghijklmnopqrstu.cpp"),
                 "1000: bailed out: ~cdefghijklmnopqrstu:3 ",
                 "[1000-1000-0/E-0/E/~cdefghijklm/]");
  const std::string name(100'000, 'n');
  EXPECT_FAILURE(assert_fail(INT32_MIN, name.c_str()),
                 "1000: bailed out: ~nnnnnnnnnnnnnnnnnnn:-2147483648 ",
                 "[1000-1000-0/E-0/E/~nnnnnnnnnnn/]");
}

TEST(zxatsys, an_assertion_that_holds_does_nothing) {
  EXPECT_TRUE(ZX_ASSERT(1 + 1 == 2));
  EXPECT_TRUE(ZX_ASSERT(&k_rows));  // anything that can be true
  EXPECT_TRUE(ZX_ASSERT_AT(true, "zxsys2", 575));
}

TEST(zxatsys, an_assertion_names_its_module_and_line) {
  const int line = __LINE__ + 1;
  const auto fail = [] { ZX_ASSERT(1 + 1 == 3); };
  const std::string place = "zxatsys_test:" + std::to_string(line);
  EXPECT_FAILURE(fail(), "1000: bailed out: " + place + " ",
                 "[1000-1000-0/E-0/E/zxatsys_test/]");
}

TEST(zxatsys, an_assertion_can_have_a_fixed_position) {
  EXPECT_FAILURE(ZX_ASSERT_AT(false, "zxsys2", 575),
                 "1000: bailed out: zxsys2:575 ",
                 "[1000-1000-0/E-0/E/zxsys2:575/]");
}

TEST(zxatsys, a_dropped_assertion_gives_false) {
  kit::with_failures_dropped([] {
    EXPECT_FALSE(ZX_ASSERT(false));
    EXPECT_FALSE(ZX_ASSERT_AT(false, "zxsys2", 575));
    EXPECT_TRUE(ZX_ASSERT(true));
  });
}

// --------------------------------------------------------- the real thing --

constexpr char k_early_case[] = "zxatsys_fails_ahead_of_start_up";

// A failure ahead of start-up, in the constructor of a static object.
bool fail_early() {
  if (kit::wanted_case() != k_early_case) return false;
  zxplat::set_last_error(0);
  bail_code(1000, "early");
  std::_Exit(0);
}
[[maybe_unused]] const bool has_failed_early = fail_early();

TEST(zxatsys, a_failure_ahead_of_start_up_is_shown_and_ends_the_process) {
  const auto start = std::chrono::steady_clock::now();
  const kit::TempDir folder;  // for the stack dump
  kit::ProcessOptions options;
  options.directory = folder.path();
  const kit::ProcessResult result = kit::run_case(k_early_case, {}, options);
  const auto took = std::chrono::steady_clock::now() - start;
  EXPECT_FALSE(result.timed_out);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(result.out,
            "\r\n  Fatal Error 1000: bailed out: early  "
            "[1000-1000-0/0-0/0/early/]\r\n");
  EXPECT_EQ(result.err, "");
  EXPECT_GE(took, std::chrono::milliseconds(900));
}

}  // namespace
