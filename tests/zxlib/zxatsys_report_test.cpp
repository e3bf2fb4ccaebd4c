// zxatsys_report_test.cpp - tests of the printed report of a failure
// (zxlib/zxatsys_report.cpp), with a file for a printer.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/target.h"
#include "kit/tempdir.h"
#include "zxatsys.h"
#include "zxplat.h"
#include "zxstkdmp.h"

namespace {

namespace fs = std::filesystem;

using zxplat::Fd;
using zxplat::OpenMode;
using Words = std::vector<std::string>;

constexpr char k_printed[] = "printed";

// A folder with a file for the printer, of which files.open knows the names
// that it is told, and the program's stack dump.  Descriptors are counted.
class Office {
 public:
  explicit Office(Words names_of_printers = {"prn"})
      : printers(std::move(names_of_printers)),
        directory(folder.path() + "\\") {
    self = this;
    stack_dump_hooks.directory = [] { return self->directory.c_str(); };
    bail_hooks.program_path = [] { return "C:\\p.exe"; };
    bail_hooks.program_name = [] { return "NAME"; };
    bail_hooks.program_version = [] { return "1.2"; };
    zxplat::files.open = open;
    zxplat::files.write = write;
    zxplat::files.close = close;
  }
  ~Office() {
    zxplat::files = zxplat::system_files;
    stack_dump_hooks = old_dump_hooks;
    bail_hooks = old_hooks;
  }
  Office(const Office&) = delete;
  Office& operator=(const Office&) = delete;

  std::string file(const std::string& name) const { return folder.file(name); }
  std::string dump_name() const { return directory + "NAME.dmp"; }
  void write_dump(const std::string& text) const {
    fs::remove(file("NAME.dmp"));  // a fresh file costs less than a cut one
    kit::write_file(file("NAME.dmp"), text);
  }

  // The report for a message: what the printer got.
  std::string report(const char* message = "message") const {
    fs::remove(file(k_printed));
    print_fatal_report(message);
    return fs::exists(file(k_printed)) ? kit::read_file(file(k_printed))
                                       : "nothing";
  }

  Words opened;  // names, with the mode's letter ahead
  int closed = 0;
  std::size_t write_limit = SIZE_MAX;
  int writes_left = INT32_MAX;  // the further ones fail

 private:
  static Fd open(std::string_view name, OpenMode mode) {
    std::string word = mode == OpenMode::create ? "w " : "? ";
    if (mode == OpenMode::read) word = "r ";
    self->opened.push_back(word + std::string(name));
    const Words& known = self->printers;
    if (std::find(known.begin(), known.end(), name) != known.end())
      return zxplat::system_files.open(self->file(k_printed), mode);
    if (name == "prn" || name == "lpt1") return zxplat::k_no_fd;
    return zxplat::system_files.open(name, mode);
  }
  static std::int64_t write(Fd fd, const void* bytes, std::size_t size) {
    if (self->writes_left-- <= 0) return -1;
    return zxplat::system_files.write(fd, bytes,
                                      std::min(size, self->write_limit));
  }
  static bool close(Fd fd) {
    ++self->closed;
    return zxplat::system_files.close(fd);
  }

  inline static Office* self = nullptr;
  const Words printers;
  const kit::TempDir folder;
  const std::string directory;
  const BailHooks old_hooks = bail_hooks;
  const StackDumpHooks old_dump_hooks = stack_dump_hooks;
};

constexpr char k_head[] =
    "\r\nFatal Error for C:\\p.exe 1.2:\r\n           message\r\n";

// What is printed of a dump: its lines, those of more than 90 bytes in
// pieces of 90, each of which counts as a line; 50 lines at most, and from
// the 31st on only those that begin with a dash.
std::string printed_of(std::string dump) {
  std::string text;
  int lines = 0;
  while (!dump.empty() && lines < 50) {
    std::string line = dump.substr(0, dump.find('\n') + 1);
    if (line.empty()) line = dump;  // no line feed behind the last line
    if (line.size() > 90) line = line.substr(0, 90);
    dump = dump.substr(line.size());
    if (lines >= 30 && line[0] != '-') continue;
    text += line;
    ++lines;
  }
  return text;
}

std::string repeated(int count, const std::function<std::string(int)>& line) {
  std::string text;
  for (int i = 0; i < count; ++i) text += line(i);
  return text;
}

std::string plain_line(int i) { return "line " + std::to_string(i) + "\r\n"; }
std::string head_line(int i) { return "- head " + std::to_string(i) + "\r\n"; }

TEST(zxatsys_report, the_head_tells_of_the_program_and_the_message) {
  const Office office;
  EXPECT_EQ(office.report(), k_head);
  EXPECT_EQ(office.report("%s%n"),
            "\r\nFatal Error for C:\\p.exe 1.2:\r\n           %s%n\r\n");
  EXPECT_EQ(office.report(""),
            "\r\nFatal Error for C:\\p.exe 1.2:\r\n           \r\n");
  EXPECT_EQ(office.report(nullptr),
            "\r\nFatal Error for C:\\p.exe 1.2:\r\n           \r\n");
}

TEST(zxatsys_report, a_short_dump_is_printed_whole) {
  const Office office;
  for (const std::string& dump :
       {std::string(), std::string("one"), std::string("one\r\n"),
        std::string("@!STKDMP\r\r\n\r\n-----\r\nbytes \0\xE0\xFF\r\n", 31),
        std::string("\n\n\n"), repeated(30, plain_line)}) {
    office.write_dump(dump);
    EXPECT_EQ(office.report(), k_head + dump);
  }
}

TEST(zxatsys_report, from_line_31_on_only_heads_of_frames_are_printed) {
  const Office office;
  office.write_dump(repeated(40, plain_line));
  EXPECT_EQ(office.report(), k_head + repeated(30, plain_line));
  // What is passed over does not count.
  office.write_dump(repeated(500, plain_line) + repeated(3, head_line));
  EXPECT_EQ(office.report(),
            k_head + repeated(30, plain_line) + repeated(3, head_line));
  office.write_dump(repeated(30, plain_line) + repeated(7, [](int i) {
                      return head_line(i) + plain_line(i) + "\r\n -\r\n";
                    }));
  EXPECT_EQ(office.report(),
            k_head + repeated(30, plain_line) + repeated(7, head_line));
}

TEST(zxatsys_report, fifty_lines_are_printed_at_most) {
  const Office office;
  office.write_dump(repeated(50, head_line));
  EXPECT_EQ(office.report(), k_head + repeated(50, head_line));
  office.write_dump(repeated(51, head_line));
  EXPECT_EQ(office.report(), k_head + repeated(50, head_line));
  office.write_dump(repeated(30, plain_line) + repeated(1000, head_line));
  EXPECT_EQ(office.report(),
            k_head + repeated(30, plain_line) + repeated(20, head_line));
}

TEST(zxatsys_report, a_line_of_more_than_90_bytes_comes_in_pieces) {
  const Office office;
  // 88 bytes and the line end make 90; the line feed of the next is a piece.
  for (const std::size_t length : {87U, 88U, 89U, 90U, 178U, 179U, 500U}) {
    SCOPED_TRACE(length);
    const std::string line = std::string(length, 'x') + "\r\n";
    const int pieces = static_cast<int>((line.size() + 89) / 90);
    office.write_dump(repeated(60, [&](int) { return line; }));
    const std::string printed = office.report().substr(sizeof k_head - 1);
    EXPECT_EQ(printed, repeated(30, [&](int) {
                         return line;
                       }).substr(0, printed.size()));
    // As many whole pieces as 30 lines have room for.
    EXPECT_EQ(printed.size(),
              static_cast<std::size_t>(30 / pieces) * line.size() +
                  static_cast<std::size_t>(30 % pieces) * 90);
  }
}

TEST(zxatsys_report, dumps_of_all_shapes_are_printed_by_the_rules) {
  const Office office;
  std::uint32_t state = 20260101;
  const auto random = [&state](std::uint32_t below) {
    state = state * 1664525 + 1013904223;
    return (state >> 8) % below;
  };
  for (int round = 0; round < 200; ++round) {
    SCOPED_TRACE(round);
    std::string dump;
    const std::uint32_t lines = random(120);
    const std::uint32_t longest = round % 2 == 0 ? 30 : 300;
    for (std::uint32_t i = 0; i < lines; ++i) {
      if (random(3) == 0) dump += '-';
      dump.append(random(longest), "x-\0\r"[random(4)]);
      if (random(20) != 0) dump += "\r\n";
    }
    office.write_dump(dump);
    EXPECT_EQ(office.report(), k_head + printed_of(dump));
  }
}

TEST(zxatsys_report, without_a_dump_the_head_is_all) {
  Office office;
  EXPECT_EQ(office.report(), k_head);
  EXPECT_EQ(office.opened, (Words{"w prn", "r " + office.dump_name()}));
  EXPECT_EQ(office.closed, 1);
}

TEST(zxatsys_report, a_dump_of_a_nameless_program_is_zxstack) {
  const Office office;
  bail_hooks.program_name = [] { return ""; };
  kit::write_file(office.file("zxstack.dmp"), "the other one\r\n");
  office.write_dump("not this\r\n");
  EXPECT_EQ(office.report(), std::string(k_head) + "the other one\r\n");
}

TEST(zxatsys_report, printer_and_dump_are_closed) {
  Office office;
  office.write_dump(repeated(1000, head_line));
  office.report();
  EXPECT_EQ(office.opened.size(), 2U);
  EXPECT_EQ(office.closed, 2);
}

TEST(zxatsys_report, the_second_printer_serves_if_there_is_no_first) {
  Office office(Words{"lpt1"});
  office.write_dump("dump\r\n");
  EXPECT_EQ(office.report(), std::string(k_head) + "dump\r\n");
  EXPECT_EQ(office.opened,
            (Words{"w prn", "w lpt1", "r " + office.dump_name()}));
  EXPECT_EQ(office.closed, 2);
}

TEST(zxatsys_report, without_a_printer_nothing_happens) {
  Office office(Words{});
  office.write_dump("dump\r\n");
  EXPECT_EQ(office.report(), "nothing");
  EXPECT_EQ(office.opened, (Words{"w prn", "w lpt1"}));
  EXPECT_EQ(office.closed, 0);
}

TEST(zxatsys_report, a_printer_may_take_byte_by_byte) {
  Office office;
  office.write_limit = 1;
  const std::string dump = repeated(60, head_line);
  office.write_dump(dump);
  EXPECT_EQ(office.report(), k_head + printed_of(dump));
}

TEST(zxatsys_report, a_printer_that_gives_out_is_closed_all_the_same) {
  for (const int writes : {0, 1, 2, 30}) {
    SCOPED_TRACE(writes);
    Office office;
    office.writes_left = writes;
    const std::string dump = repeated(60, head_line);
    office.write_dump(dump);
    const std::string whole = k_head + printed_of(dump);
    const std::string printed = office.report();
    EXPECT_EQ(printed, whole.substr(0, printed.size()));
    EXPECT_LT(printed.size(), whole.size());
    EXPECT_EQ(office.closed, 2);
  }
}

TEST(zxatsys_report, a_printer_that_takes_nothing_is_given_up) {
  Office office;
  office.write_limit = 0;
  office.write_dump("dump\r\n");
  EXPECT_EQ(office.report(), "");
  EXPECT_EQ(office.closed, 2);
}

TEST(zxatsys_report, texts_of_any_length_are_printed_in_bounds) {
  static const std::string text(100'000, 'x');
  Office office;
  bail_hooks.program_path = [] { return text.c_str(); };
  bail_hooks.program_version = [] { return text.c_str(); };
  office.write_dump("dump\r\n");
  const std::string printed = office.report(text.c_str());
  EXPECT_TRUE(printed.starts_with("\r\nFatal Error for xxxx"));
  EXPECT_NE(printed.find("x x"), std::string::npos);
  EXPECT_NE(printed.find("x:\r\n           x"), std::string::npos);
  EXPECT_TRUE(printed.ends_with("x\r\ndump\r\n"));
}

TEST(zxatsys_report, messages_of_two_thousand_bytes_are_printed_whole) {
  const Office office;
  const std::string text(2000, 'x');
  EXPECT_EQ(
      office.report(text.c_str()),
      "\r\nFatal Error for C:\\p.exe 1.2:\r\n           " + text + "\r\n");
}

// A Windows machine may have a printer, which the test must leave alone.
TEST(zxatsys_report, a_system_without_printers_has_no_such_files) {
  if (kit::on_windows()) GTEST_SKIP() << "there may be a printer";
  const kit::TempDir folder;
  const kit::WorkingIn place(folder.path());
  print_fatal_report("message");
  for (const char* name : {"prn", "PRN", "Prn", "lpt1", "LPT1", "Lpt1"}) {
    for (const OpenMode mode :
         {OpenMode::read, OpenMode::create, OpenMode::create_new,
          OpenMode::create_private, OpenMode::read_write, OpenMode::append}) {
      zxplat::set_last_error(0);
      EXPECT_EQ(zxplat::files.open(name, mode), zxplat::k_no_fd) << name;
      EXPECT_EQ(zxplat::last_error(), zxplat::k_err_not_found) << name;
    }
  }
  EXPECT_TRUE(fs::is_empty(folder.path()));
}

}  // namespace
