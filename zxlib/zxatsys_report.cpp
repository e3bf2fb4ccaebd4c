// zxatsys_report.cpp - the printed report of a failure.
// Tests: tests/zxlib/zxatsys_test.cpp.
#include <algorithm>

#include "zxatsys.h"
#include "zxplat.h"
#include "zxstkdmp.h"
#include "zxtext.h"

namespace {

constexpr int k_max_lines = 50;
// From this line on only the heads of frames are printed.
constexpr int k_first_heads_only = 31;
constexpr std::size_t k_max_line = 90;

constexpr std::size_t k_head_room = 8192;
constexpr std::size_t k_shown = 2048;  // of the path and of the message

char report_head[k_head_room];

zxplat::Fd open_printer() {
  for (const char* name : {"prn", "lpt1"}) {
    const zxplat::Fd fd = zxplat::files.open(name, zxplat::OpenMode::create);
    if (fd != zxplat::k_no_fd) return fd;
  }
  return zxplat::k_no_fd;
}

void print_head(zxplat::Fd printer, const char* message) {
  zxText head(report_head);
  head.add("\r\nFatal Error for ");
  head.add(bail_hooks.program_path(), k_shown);
  head.add(" ");
  head.add(bail_hooks.program_version(), k_shown);
  head.add(":\r\n           ");
  head.add(message != nullptr ? message : "", k_shown);
  head.add("\r\n");
  zxplat::write_all(printer, head.view());
}

// The lines of a file, one after the other, each with its line feed.  A line
// of more than 90 bytes comes in pieces of that size.
class Lines {
 public:
  explicit Lines(zxplat::Fd file) : fd(file) {}

  // The next line, which lasts until the next call; empty at the end.
  std::string_view next() {
    refill();
    const std::string_view unread(room + start, end - start);
    const std::string_view line =
        unread.substr(0, std::min(unread.find('\n'), unread.size() - 1) + 1)
            .substr(0, k_max_line);
    start += line.size();
    return line;
  }

 private:
  // Sees to it that the buffer holds a whole line, if there is one.
  void refill() {
    if (end - start >= k_max_line || at_end) return;
    std::copy(room + start, room + end, room);
    end -= start;
    start = 0;
    while (end < k_max_line && !at_end) {
      const std::int64_t got =
          zxplat::files.read(fd, room + end, sizeof room - end);
      if (got <= 0)
        at_end = true;
      else
        end += static_cast<std::size_t>(got);
    }
  }

  zxplat::Fd fd;
  char room[512];
  std::size_t start = 0;
  std::size_t end = 0;
  bool at_end = false;
};

void print_lines(zxplat::Fd printer, zxplat::Fd dump) {
  Lines lines(dump);
  for (int count = 1; count <= k_max_lines;) {
    const std::string_view line = lines.next();
    if (line.empty()) return;
    if (count >= k_first_heads_only && line.front() != '-') continue;
    zxplat::write_all(printer, line);
    ++count;
  }
}

}  // namespace

void print_fatal_report(const char* message) {
  const zxplat::Fd printer = open_printer();
  if (printer == zxplat::k_no_fd) return;
  print_head(printer, message);
  char name[zxplat::k_max_name + 1];
  zxText text(name);
  add_stack_dump_name(text);
  const zxplat::Fd dump =
      zxplat::files.open(text.view(), zxplat::OpenMode::read);
  if (dump != zxplat::k_no_fd) {
    print_lines(printer, dump);
    zxplat::files.close(dump);
  }
  zxplat::files.close(printer);
}
