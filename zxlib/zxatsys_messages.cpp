// zxatsys_messages.cpp - the numbered message table of the failure core.
//
// Numbers are grouped by the area that raises them; gaps are unused, and
// many rows serve parts of a site's programs beside this library.  Numbers
// and texts reach operators and their notes: they never change.
#include <cstddef>
#include <iterator>
#include <string_view>

#include "zxatsys_impl.h"

namespace {

// clang-format off
constexpr BailMessage k_messages[] = {
    // Files.
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
    // System and threads.
    {1100, "sys: failed on '%.140s'"},
    {1101, "sys: failed on '%.140s'"},
    {1102, "stop threads: tasks still active"},
    {1103, "check threads: stack overflow"},
    {1104, "switch threads: stack overflow"},
    {1105, "term thread: cant stop thread zero"},
    {1106, "alloc thread: no mem or thread space"},
    {1107, "alloc thread: compiler err"},
    {1108, "init threads: no mem"},
    // Break and serial ports.
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
    // Vectors.
    {1300, "vector: illegal size"},
    {1301, "vector: index overflow"},
    {1302, "C vector: index overflow"},
    {1303, "matrix: index overflow"},
    // Comparison.
    {1400, "valcmps: index overflow"},
    // Window colours and menus.
    {1500, "hwin: bad color"},
    {1501, "hwin: toobig menu"},
    // Hash tables.
    {1600, "hash: bad val"},
    {1601, "hash: tbl full"},
    {1602, "hash: elem exist"},
    {1603, "hash: bad val"},
    // Screen and windows.
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
    // Dates and times.
    {1801, "setdate: bad date"},
    {1803, "settime: bad time (#)"},
    // Pointer difference.
    {1900, "ptrdiff: too big"},
    // Memory and system.
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
    // Record arrays.
    {2100, "vra: file sz > allocated"},
    {2101, "vra: bad file read"},
    {2102, "vra: file read miss"},
    // Containers.
    {2201, "zxaa: tbl too big"},
    {2202, "zxaa: no such element"},
    {2203, "zxsa: no such element '%.140s'"},
    {2204, "zxaa: no such element to erase"},
    {2205, "zxva: tbl too big"},
    // Packing.
    {2300, "unpack: str too short"},
    {2301, "binshift: str too short"},
    // Configuration.
    {2400, "conf err: %.140s"},
    // Dynamic data exchange.
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
    // Maths and environment.
    {3000, "general math err (829=NAN/bad op 835=flt stk ovrflow)"},
    {3001, "int divide by zero"},
    {3002, "float div by zero"},
    {3003, "float ovrflow"},
    {3004, "math func"},
    {3005, "bad env"},
    {3006, "bad compiler"},
    // Forms.
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
    // Graphics.
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

constexpr bool numbers_rise() {
  for (std::size_t i = 1; i < std::size(k_messages); ++i)
    if (k_messages[i - 1].number >= k_messages[i].number) return false;
  return true;
}

// True if a text has at most one "%", and that begins a known place.
constexpr bool has_one_place(std::string_view text) {
  const std::size_t place = text.find('%');
  if (place == std::string_view::npos) return true;
  if (text.find('%', place + 1) != std::string_view::npos) return false;
  const std::string_view rest = text.substr(place);
  return rest.starts_with("%s") || rest.starts_with("%.140s") ||
         rest.starts_with("%d");
}

constexpr bool places_are_known() {
  for (const BailMessage& row : k_messages)
    if (!has_one_place(row.text)) return false;
  return true;
}

static_assert(std::size(k_messages) == 187);
static_assert(numbers_rise());
static_assert(places_are_known());

}  // namespace

const char* find_bail_message(std::int32_t number) {
  for (const BailMessage& row : k_messages)
    if (row.number == number) return row.text;
  return nullptr;
}
