// zxstkdmp_test.cpp - the stack dump: the places of its file, its lines, the
// walk over chains of frames, made-up and real ones, and frame markers.
// Tests zxlib/zxstkdmp.h and zxstkdmp.cpp.
//
// What a walk must show is composed by a second, plain walk over the same
// memory (class Model); where the text is short it stands here in full.
#include "zxstkdmp.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cinttypes>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <functional>
#include <iterator>
#include <memory>
#include <random>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "zxatsys.h"
#include "zxfile.h"
#include "zxmainf.h"
#include "zxplat.h"
#include "zxstr.h"

namespace {

namespace fs = std::filesystem;

using kit::names_in;
using kit::TempDir;
using zxplat::k_no_fd;

using Word = std::uintptr_t;
constexpr Word k_word = sizeof(Word);

constexpr std::uint32_t k_check = 0x1234;

// ------------------------------------------------------------------ texts --

std::string upper_hex(std::uintptr_t number, std::size_t digits) {
  char room[40];
  std::snprintf(room, sizeof room, "%0*" PRIXPTR, static_cast<int>(digits),
                number);
  return room;
}

std::string address(Word place) { return upper_hex(place, 2 * k_word); }

// A word of a frame.
std::string hex_word(Word word) {
  char room[40];
  std::snprintf(room, sizeof room, "%0*" PRIxPTR, static_cast<int>(2 * k_word),
                word);
  return room;
}

std::string frame_head(Word return_address, Word next) {
  return "------ ret @ADDR " + address(return_address) +
         "   BP: " + address(next) + "\n";
}

// A text as it stands in the file.
std::string on_disk(std::string_view text) {
  std::string bytes;
  for (const char c : text) {
    if (c == '\n') bytes += '\r';
    bytes += c;
  }
  return bytes;
}

// Compares long texts and shows the first lines that differ.
testing::AssertionResult same_text(const std::string& actual,
                                   const std::string& expected) {
  if (actual == expected) return testing::AssertionSuccess();
  const auto first =
      static_cast<std::size_t>(std::mismatch(actual.begin(), actual.end(),
                                             expected.begin(), expected.end())
                                   .first -
                               actual.begin());
  const std::size_t line = actual.rfind('\n', first);
  const std::size_t start =
      first == 0 || line == actual.npos ? 0 : std::min(line + 1, first);
  return testing::AssertionFailure()
         << "differ at byte " << first << " of " << actual.size() << " and "
         << expected.size() << "\n  is:        "
         << testing::PrintToString(actual.substr(start, 100))
         << "\n  should be: "
         << testing::PrintToString(expected.substr(start, 100));
}

// ----------------------------------------------------------------- seams --

// What takes place, in its order.
std::vector<std::string> events;

// The program that fails; its values and hooks are put back at the end.
class Program {
 public:
  Program() {
    directory = "D:\\START\\";
    name = "PROG";
    path = "D:\\BIN\\PROG.EXE";
    version = "1.1";
    module_lines.clear();
    events.clear();
    bail_hooks.program_path = [] { return path.c_str(); };
    bail_hooks.program_name = [] { return name.c_str(); };
    bail_hooks.program_version = [] { return version.c_str(); };
    stack_dump_hooks.directory = [] { return directory.c_str(); };
    stack_dump_hooks.close_files = [] { events.push_back("close files"); };
    stack_dump_hooks.write_module_lines =
        [](void (*write)(std::string_view text)) {
          events.push_back("module lines");
          for (const std::string& text : module_lines) write(text);
        };
  }
  Program(const Program&) = delete;
  Program& operator=(const Program&) = delete;
  ~Program() {
    bail_hooks = old_bail_hooks;
    stack_dump_hooks = old_hooks;
    stack_dump_fault = {};
  }

  static inline std::string directory;
  static inline std::string name;
  static inline std::string path;
  static inline std::string version;
  static inline std::vector<std::string> module_lines;

 private:
  const BailHooks old_bail_hooks = bail_hooks;
  const StackDumpHooks old_hooks = stack_dump_hooks;
};

// What a new file comes to.
enum class Place {
  good,
  no_file,      // the name does not open
  no_byte,      // it opens, and takes nothing
  some_bytes,   // it takes a part of the first line
  a_byte_less,  // all of the first line but its last byte
  first_line,   // and nothing behind it
};

std::size_t room_in(Place place) {
  switch (place) {
    case Place::no_file:
    case Place::no_byte:
      return 0;
    case Place::some_bytes:
      return 3;
    case Place::a_byte_less:
      return 10;
    case Place::first_line:
      return 11;
    case Place::good:
      break;
  }
  return SIZE_MAX;
}

// A disk of which each file comes to what was planned for it, the last plan
// holding for all behind it.
class Disk {
 public:
  struct File {
    std::string name;
    std::string bytes;
    std::size_t room;
    bool is_open;
  };

  explicit Disk(std::vector<Place> wanted = {Place::good})
      : plan(std::move(wanted)) {
    self = this;
    events.clear();
    zxplat::files.open = open;
    zxplat::files.write = write;
    zxplat::files.close = close;
  }
  Disk(const Disk&) = delete;
  Disk& operator=(const Disk&) = delete;
  ~Disk() {
    zxplat::files = zxplat::system_files;
    for (const File& file : files) EXPECT_FALSE(file.is_open) << file.name;
  }

  // The bytes of the only file.
  std::string bytes() const {
    EXPECT_EQ(files.size(), 1U);
    return files.empty() ? "" : files[0].bytes;
  }

  std::vector<File> files;
  std::size_t most_at_once = SIZE_MAX;  // that a write takes
  std::function<void()> at_open;
  std::function<void()> at_close;

 private:
  static constexpr zxplat::Fd k_first_fd = 1000;

  static zxplat::Fd open(std::string_view name, zxplat::OpenMode mode) {
    EXPECT_EQ(mode, zxplat::OpenMode::create);
    events.push_back("open " + std::string(name));
    if (self->at_open) self->at_open();
    const Place place =
        self->plan[std::min(self->opened++, self->plan.size() - 1)];
    // The number of an earlier failure has no say in what comes next.
    zxplat::set_last_error(zxplat::k_err_denied);
    if (place == Place::no_file) return k_no_fd;
    self->files.push_back({std::string(name), "", room_in(place), true});
    return k_first_fd + static_cast<zxplat::Fd>(self->files.size()) - 1;
  }

  static File& file_of(zxplat::Fd fd) {
    File& file = self->files.at(static_cast<std::size_t>(fd - k_first_fd));
    EXPECT_TRUE(file.is_open);
    return file;
  }

  static std::int64_t write(zxplat::Fd fd, const void* bytes,
                            std::size_t size) {
    File& file = file_of(fd);
    const std::size_t count =
        std::min({size, self->most_at_once, file.room - file.bytes.size()});
    file.bytes.append(static_cast<const char*>(bytes), count);
    if (count > 0) return static_cast<std::int64_t>(count);
    zxplat::set_last_error(zxplat::k_err_disk_full);
    return -1;
  }

  static bool close(zxplat::Fd fd) {
    events.push_back("close");
    file_of(fd).is_open = false;
    if (self->at_close) self->at_close();
    return true;
  }

  static inline Disk* self = nullptr;
  const std::vector<Place> plan;
  std::size_t opened = 0;
};

// The lines ahead of the frames.
std::string head_with(const std::string& message) {
  return "@!STKDMP\r\r\n"
         "\r\n"
         "-------------------STACK DUMP-------------------\r\n"
         "@ENV:WIN32\r\n"
         "@PROG:D:\\BIN\\PROG.EXE\r\n"
         "@VER:1.1\r\n"
         "@ERR:" +
         message + "\r\n";
}

// What follows the head of a dump.
std::string behind_head(const std::string& dump) {
  const std::string head = head_with("message");
  EXPECT_TRUE(dump.starts_with(head)) << dump.substr(0, 200);
  return dump.starts_with(head) ? dump.substr(head.size()) : dump;
}

// ------------------------------------------------- the dump of a fault --

constexpr Word k_instruction = 0x00C0FFEE;

// Dumps a fault in the frame at `frame`.
void dump_fault(Word frame) {
  stack_dump_fault = {true, frame, k_instruction};
  dump_stack(k_check, "message");
  stack_dump_fault = {};
}

// The lines behind the head, as they stand in the file.
std::string fault_dump(Word frame) {
  const Program program;
  const Disk disk;
  dump_fault(frame);
  return behind_head(disk.bytes());
}

// -------------------------------------------------------------- the model --

// Memory of which all can be read, and nothing right behind it.
struct Stretch {
  Word begin;
  Word end;

  bool holds(Word from, Word size) const {
    return from >= begin && from <= end && size <= end - from;
  }
};

struct MarkerLine {
  Word place;
  std::string text;
};

// A second walk.
class Model {
 public:
  Model(Stretch readable, bool of_fault, std::vector<MarkerLine> lines = {})
      : memory(readable), in_fault(of_fault), markers(std::move(lines)) {}

  // The text of a walk from `bp`, with plain line feeds.
  std::string walk(Word bp) {
    text.clear();
    for (int number = 0; number < 1000; ++number) {
      if (!memory.holds(bp, k_word)) return text + "# BadReadPtr\n";
      const Word next = word_at(bp);
      if (next == 0 || next <= bp || next - bp > 0x20000) {
        text += "# bad dump_bp\n";
        return number < 3 ? text + raw(bp) : text;
      }
      if (!memory.holds(bp, next - bp) || !memory.holds(bp + k_word, k_word))
        return text + "# BadReadPtr\n";
      const Word return_address = word_at(bp + k_word);
      if (return_address == 0) return in_fault ? text : text + raw(bp);
      if (!in_fault) add_markers(next);
      text += frame_head(return_address, next);
      add_words(number, bp, next);
      bp = next;
    }
    return text;
  }

  std::string raw(Word from) const {
    std::string rows = "------ raw dump start\n";
    for (Word at = from; at - from < 0x40000 * 4 && memory.holds(at, 32);
         at += 32) {
      for (const Word row : {at, at + 16}) {
        rows += "[" + address(row) + "] ";
        for (Word i = 0; i < 4; ++i) {
          std::uint32_t word = 0;
          zxplat::read_memory(row + 4 * i, &word, 4);
          rows += upper_hex(word, 8) + " ";
        }
        rows += "\n";
      }
    }
    return rows;
  }

 private:
  static Word word_at(Word place) {
    Word word = 0;
    zxplat::read_memory(place, &word, k_word);
    return word;
  }

  void add_markers(Word next) {
    while (!markers.empty() && markers.front().place <= next) {
      text += "@APP " + markers.front().text + "\n";
      markers.erase(markers.begin());
    }
  }

  void add_words(int number, Word bp, Word next) {
    Word column = 0;
    for (Word at = bp + 2 * k_word; at + k_word <= next; at += k_word) {
      if (column++ % 8 == 0) {
        text += number < 10 ? "\n " : "\n";
        text += std::to_string(number) + ": [" + address(at) + "] ";
      }
      text += hex_word(word_at(at)) + "  ";
    }
    text += "\n";
  }

  Stretch memory;
  bool in_fault;
  std::vector<MarkerLine> markers;
  std::string text;
};

// -------------------------------------------------------- made-up memory --

// Words for made-up frames, each of which starts out different, with nothing
// to be read behind the last.
class Words {
 public:
  explicit Words(std::size_t least)
      : memory(least * k_word),
        count(static_cast<std::size_t>(memory.end() - memory.begin()) /
              k_word) {
    for (std::size_t i = 0; i < count; ++i) set(i, value(i));
  }

  // Spread over all the bits.
  static Word value(std::size_t i) {
    return static_cast<Word>((i + 1) * 0x9E3779B97F4A7C15U);
  }

  std::size_t size() const { return count; }
  Word begin() const { return at(0); }
  Word end() const { return at(count); }
  Stretch stretch() const { return {begin(), end()}; }

  Word at(std::size_t i) const {
    return reinterpret_cast<Word>(memory.begin()) + i * k_word;
  }

  void set(std::size_t i, Word word) { set_at(at(i), word); }

  static void set_at(Word place, Word word) {
    std::memcpy(reinterpret_cast<void*>(place), &word, k_word);
  }

 private:
  kit::GuardedMemory memory;
  std::size_t count;
};

Word return_address_of(Word frame) { return 0x00401000 + frame % 0x1000; }

// Lays a chain of frames of so many words from `bp` on; the place of the
// frame behind them, of which nothing is written.
Word lay_frames(Word bp, const std::vector<std::size_t>& sizes) {
  for (const std::size_t size : sizes) {
    const Word next = bp + (2 + size) * k_word;
    Words::set_at(bp, next);
    Words::set_at(bp + k_word, return_address_of(bp));
    bp = next;
  }
  return bp;
}

// The frame with which a chain ends: what is read there.
void lay_end(Word bp, Word next, Word return_address) {
  Words::set_at(bp, next);
  Words::set_at(bp + k_word, return_address);
}

void expect_fault_dump(const Words& words, Word frame) {
  const std::string expected = frame_head(k_instruction, frame) +
                               Model(words.stretch(), true).walk(frame);
  EXPECT_TRUE(same_text(fault_dump(frame), on_disk(expected)));
}

// ------------------------------------------------------------------ head --

TEST(zxstkdmp, the_head_names_program_version_and_message) {
  EXPECT_EQ(fault_dump(0), on_disk(frame_head(k_instruction, 0)));
}

TEST(zxstkdmp, a_fault_without_a_frame_has_a_frame_head_and_no_walk) {
  const std::string zeros(2 * k_word, '0');
  EXPECT_EQ(fault_dump(0), "------ ret @ADDR " + zeros.substr(8) +
                               "00C0FFEE   BP: " + zeros + "\r\n");
}

TEST(zxstkdmp, the_values_of_the_head_are_whatever_they_are) {
  const std::string of_10000(10'000, 'x');
  const struct {
    std::string path;
    std::string version;
    const char* message;
    std::string lines;
  } rows[] = {
      {"", "", "", "@PROG:\r\n@VER:\r\n@ERR:\r\n"},
      {"p", "v", nullptr, "@PROG:p\r\n@VER:v\r\n@ERR:\r\n"},
      {"%s%n", "%d", "100%", "@PROG:%s%n\r\n@VER:%d\r\n@ERR:100%\r\n"},
      {"p", "v", "a\nb\n", "@PROG:p\r\n@VER:v\r\n@ERR:a\r\nb\r\n\r\n"},
      {"p", "v", "\r\n", "@PROG:p\r\n@VER:v\r\n@ERR:\r\r\n\r\n"},
      {"\xF9\xEC", "\xED", "\x80\xFF",
       "@PROG:\xF9\xEC\r\n@VER:\xED\r\n@ERR:\x80\xFF\r\n"},
      {of_10000, of_10000, of_10000.c_str(),
       "@PROG:" + of_10000 + "\r\n@VER:" + of_10000 + "\r\n@ERR:" + of_10000 +
           "\r\n"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.lines.substr(0, 50));
    const Program program;
    const Disk disk;
    Program::path = row.path;
    Program::version = row.version;
    stack_dump_fault = {true, 0, k_instruction};
    dump_stack(k_check, row.message);
    EXPECT_TRUE(same_text(
        disk.bytes(),
        "@!STKDMP\r\r\n\r\n-------------------STACK DUMP-------------------\r\n"
        "@ENV:WIN32\r\n" +
            row.lines + on_disk(frame_head(k_instruction, 0))));
  }
}

// A line feed can fall on any place of what is written at once.
TEST(zxstkdmp, line_feeds_are_two_bytes_wherever_they_fall) {
  for (std::size_t length = 3960; length < 4100; ++length) {
    const Program program;
    const Disk disk;
    const std::string message = std::string(length, 'x') + "\n\n\ny";
    stack_dump_fault = {true, 0, k_instruction};
    dump_stack(k_check, message.c_str());
    ASSERT_TRUE(same_text(
        disk.bytes(),
        head_with(on_disk(message)) + on_disk(frame_head(k_instruction, 0))));
  }
}

TEST(zxstkdmp, short_writes_are_gone_on_with) {
  for (const std::size_t most : {1U, 2U, 7U, 1000U}) {
    const Program program;
    Disk disk;
    disk.most_at_once = most;
    dump_fault(0);
    EXPECT_EQ(behind_head(disk.bytes()), on_disk(frame_head(k_instruction, 0)));
    EXPECT_EQ(events.size(), 2U);
  }
}

// ------------------------------------------------- the places of the file --

// The events of a dump of which each try ends in its closing.
std::vector<std::string> all_tries(const std::string& directory,
                                   const std::string& name) {
  std::vector<std::string> tries = {"open " + directory + name + ".dmp",
                                    "close"};
  for (const char drive : std::string_view("CDEFGHIJKLMNOPQRSTUVWXYZ")) {
    tries.push_back(std::string("open ") + drive + ":\\" + name + ".dmp");
    tries.push_back("close");
  }
  tries.push_back("open " + name + ".dmp");
  tries.push_back("close");
  return tries;
}

using Events = std::vector<std::string>;

template <class Element>
std::vector<Element> operator+(std::vector<Element> a,
                               const std::vector<Element>& b) {
  a.insert(a.end(), b.begin(), b.end());
  return a;
}

TEST(zxstkdmp, the_first_place_is_the_directory_of_the_start) {
  const Program program;
  const Disk disk;
  dump_fault(0);
  EXPECT_EQ(events, (Events{"open D:\\START\\PROG.dmp", "close"}));
}

TEST(zxstkdmp, the_name_of_the_file_is_that_of_the_program) {
  const struct {
    const char* directory;
    const char* name;
    const char* file;
  } rows[] = {
      {"D:\\START\\", "PROG", "D:\\START\\PROG.dmp"},
      {"D:\\START\\", "", "D:\\START\\zxstack.dmp"},
      {"", "PROG", "PROG.dmp"},
      {"", "", "zxstack.dmp"},
      {"\\", "A B.C", "\\A B.C.dmp"},
      {"\\\\HOST\\SHARE\\", "%s", "\\\\HOST\\SHARE\\%s.dmp"},
  };
  for (const auto& row : rows) {
    const Program program;
    Program::directory = row.directory;
    Program::name = row.name;
    const Disk disk;
    dump_fault(0);
    EXPECT_EQ(events, (Events{std::string("open ") + row.file, "close"}));
    char room[100];
    zxText text(room);
    add_stack_dump_name(text);
    EXPECT_EQ(text.view(), row.file);
  }
}

TEST(zxstkdmp, a_disk_that_takes_no_line_is_passed_over_for_the_next) {
  for (const Place full :
       {Place::no_byte, Place::some_bytes, Place::a_byte_less}) {
    const Events tries = all_tries("D:\\START\\", "PROG");
    ASSERT_EQ(tries.size(), 2 * 26U);
    for (std::size_t good = 0; good < 26; ++good) {
      SCOPED_TRACE(good);
      const Program program;
      std::vector<Place> plan(good, full);
      plan.push_back(Place::good);
      const Disk disk(plan);
      dump_fault(0);
      EXPECT_EQ(events, Events(tries.begin(),
                               tries.begin() +
                                   static_cast<std::ptrdiff_t>(2 * good + 2)));
      ASSERT_EQ(disk.files.size(), good + 1);
      EXPECT_EQ(behind_head(disk.files[good].bytes),
                on_disk(frame_head(k_instruction, 0)));
      for (std::size_t i = 0; i < good; ++i) {
        EXPECT_EQ(disk.files[i].bytes,
                  std::string("@!STKDMP\r\r\n").substr(0, room_in(full)));
      }
    }
  }
}

TEST(zxstkdmp, behind_the_last_place_all_are_tried_again_without_open_files) {
  const Program program;
  Program::name = "";
  const Disk disk({Place::no_byte});
  dump_fault(0);
  const Events tries = all_tries("D:\\START\\", "zxstack");
  EXPECT_EQ(events, tries + Events{"close files"} + tries);
  EXPECT_EQ(disk.files.size(), 2 * 26U);
  for (const Disk::File& file : disk.files) EXPECT_EQ(file.bytes, "");
}

TEST(zxstkdmp, a_name_that_does_not_open_ends_the_tries_at_once) {
  const Program program;
  const Disk disk({Place::no_file});
  dump_fault(0);
  EXPECT_EQ(events, (Events{"open D:\\START\\PROG.dmp", "close files",
                            "open D:\\START\\PROG.dmp"}));
}

TEST(zxstkdmp, a_drive_that_does_not_open_ends_the_tries_as_well) {
  const Events tries = all_tries("D:\\START\\", "PROG");
  for (std::size_t bad = 0; bad < 26; ++bad) {
    SCOPED_TRACE(bad);
    std::vector<Place> plan(bad, Place::no_byte);
    plan.push_back(Place::no_file);
    std::vector<Place> twice = plan;
    twice.insert(twice.end(), plan.begin(), plan.end());
    const Program program;
    const Disk disk(twice);
    dump_fault(0);
    const Events one_round(
        tries.begin(),
        tries.begin() + static_cast<std::ptrdiff_t>(2 * bad + 1));
    EXPECT_EQ(events, one_round + Events{"close files"} + one_round);
  }
}

TEST(zxstkdmp, a_place_that_opens_once_files_are_closed_gets_the_dump) {
  const Program program;
  const Disk disk({Place::no_file, Place::no_byte, Place::good});
  dump_fault(0);
  EXPECT_EQ(events, (Events{"open D:\\START\\PROG.dmp", "close files",
                            "open D:\\START\\PROG.dmp", "close",
                            "open C:\\PROG.dmp", "close"}));
  ASSERT_EQ(disk.files.size(), 2U);
  EXPECT_EQ(behind_head(disk.files[1].bytes),
            on_disk(frame_head(k_instruction, 0)));
}

TEST(zxstkdmp, without_a_file_nothing_is_asked_of_modules_and_markers) {
  const Program program;
  const Disk disk({Place::no_file});
  dump_stack(k_check, "message");
  EXPECT_EQ(events, (Events{"open D:\\START\\PROG.dmp", "close files",
                            "open D:\\START\\PROG.dmp"}));
}

TEST(zxstkdmp, a_dump_that_found_no_place_leaves_nothing_to_the_next_one) {
  const Program program;
  {
    const Disk disk({Place::no_byte});
    dump_fault(0);
  }
  const Disk disk;
  dump_fault(0);
  EXPECT_EQ(behind_head(disk.bytes()), on_disk(frame_head(k_instruction, 0)));
}

TEST(zxstkdmp, write_errors_behind_the_first_line_go_unnoticed) {
  Words words(1000);
  const Word end = lay_frames(words.begin(), {0, 300, 300});
  lay_end(end, 0, 1);
  const Program program;
  const Disk disk({Place::first_line});
  dump_fault(words.begin());
  EXPECT_EQ(events, (Events{"open D:\\START\\PROG.dmp", "close"}));
  EXPECT_EQ(disk.bytes(), "@!STKDMP\r\r\n");
}

TEST(zxstkdmp, names_of_any_length_are_tried_in_bounds) {
  const Program program;
  Program::directory = "D:\\" + std::string(100'000, 'd') + "\\";
  Program::name = std::string(100'000, 'n');
  const Disk disk({Place::no_byte});
  dump_fault(0);
  ASSERT_EQ(disk.files.size(), 2 * 26U);
  for (const Disk::File& file : disk.files)
    EXPECT_LE(file.name.size(), zxplat::k_max_name);
  EXPECT_TRUE(disk.files[0].name.starts_with("D:\\ddd"));
  EXPECT_TRUE(disk.files[1].name.starts_with("C:\\nnn"));
  EXPECT_TRUE(disk.files[1].name.ends_with("nnn.dmp"));
  EXPECT_TRUE(disk.files[25].name.starts_with("nnn"));
}

// ------------------------------------------------------------- real files --

TEST(zxstkdmp, the_file_is_replaced_by_each_dump) {
  const TempDir dir;
  const Program program;
  Program::directory = dir.path() + "\\";
  kit::write_file(dir.file("PROG.dmp"), std::string(100'000, 'x'));
  stack_dump_fault = {true, 0, k_instruction};
  for (const char* message : {"a longer first message", "message", "m"}) {
    dump_stack(k_check, message);
    EXPECT_EQ(kit::read_file(dir.file("PROG.dmp")),
              head_with(message) + on_disk(frame_head(k_instruction, 0)));
  }
  EXPECT_EQ(names_in(dir.path()), (std::vector<std::string>{"PROG.dmp"}));
}

TEST(zxstkdmp, without_a_directory_the_file_stands_in_the_present_one) {
  const TempDir dir;
  const kit::WorkingIn there(dir.path());
  const Program program;
  Program::directory = "";
  Program::name = "";
  dump_fault(0);
  EXPECT_EQ(behind_head(kit::read_file(dir.file("zxstack.dmp"))),
            on_disk(frame_head(k_instruction, 0)));
  EXPECT_EQ(names_in(dir.path()), (std::vector<std::string>{"zxstack.dmp"}));
}

TEST(zxstkdmp, a_directory_that_is_gone_leaves_no_file_anywhere) {
  const TempDir dir;
  const kit::WorkingIn there(dir.path());
  const Program program;
  Program::directory = dir.file("gone") + "\\";
  dump_fault(0);
  EXPECT_EQ(names_in(dir.path()), std::vector<std::string>{});
  EXPECT_EQ(events, Events{"close files"});
}

// ------------------------------------- the walk over made-up frames --

TEST(zxstkdmp, a_frame_is_its_head_and_its_words) {
  Words words(1000);
  // The words of this frame are 2 and 3; the next one begins at 4.
  words.set(0, words.at(4));
  words.set(1, 0xABCDEF);
  words.set(2, 0x12AB);
  words.set(3, ~Word{0});
  lay_end(words.at(4), words.at(9), 0);
  EXPECT_EQ(fault_dump(words.at(0)),
            "------ ret @ADDR " + address(k_instruction) +
                "   BP: " + address(words.at(0)) +
                "\r\n"
                "------ ret @ADDR " +
                address(0xABCDEF) + "   BP: " + address(words.at(4)) +
                "\r\n"
                "\r\n 0: [" +
                address(words.at(2)) + "] " + hex_word(0x12AB) + "  " +
                std::string(2 * k_word, 'f') + "  \r\n");
}

TEST(zxstkdmp, each_row_of_a_frame_has_eight_words) {
  Words words(1000);
  const Word end = lay_frames(words.begin(), {0, 17});
  lay_end(end, words.end(), 0);
  const Word bp = words.at(2);  // of the second frame, its words from 4 on
  std::string expected = frame_head(k_instruction, words.at(0)) +
                         frame_head(return_address_of(words.at(0)), bp) + "\n" +
                         frame_head(return_address_of(bp), words.at(21));
  expected += "\n 1: [" + address(words.at(4)) + "] ";
  for (std::size_t i = 4; i < 12; ++i)
    expected += hex_word(Words::value(i)) + "  ";
  expected += "\n 1: [" + address(words.at(12)) + "] ";
  for (std::size_t i = 12; i < 20; ++i)
    expected += hex_word(Words::value(i)) + "  ";
  expected += "\n 1: [" + address(words.at(20)) + "] " +
              hex_word(Words::value(20)) + "  \n";
  EXPECT_TRUE(same_text(fault_dump(words.begin()), on_disk(expected)));
}

TEST(zxstkdmp, frames_of_every_size_are_shown_word_by_word) {
  for (const std::size_t size : {0U, 1U, 2U, 7U, 8U, 9U, 15U, 16U, 17U, 500U}) {
    SCOPED_TRACE(size);
    Words words(2000);
    lay_end(lay_frames(words.begin(), {size, 1, size}), words.end(), 0);
    expect_fault_dump(words, words.begin());
  }
}

TEST(zxstkdmp, a_fault_whose_chain_ends_without_return_address_has_no_raw) {
  for (std::size_t count = 0; count < 5; ++count) {
    Words words(1000);
    const Word end =
        lay_frames(words.begin(), std::vector<std::size_t>(count, 3));
    lay_end(end, words.end(), 0);
    const std::string dump = fault_dump(words.begin());
    EXPECT_EQ(dump.find("raw"), dump.npos);
    EXPECT_EQ(dump.find('#'), dump.npos);
    expect_fault_dump(words, words.begin());
  }
}

// The ways for a frame pointer to be wrong, seen from the frame at `bp`.
std::vector<Word> wrong_nexts(Word bp) {
  return {0,
          1,
          bp,
          bp - 1,
          bp - k_word,
          bp - 0x10000,
          bp + 0x20000 + 1,
          bp + 0x20000 + k_word,
          bp + 0x40000,
          bp + 0x7FFF'FFFF,
          bp + ~Word{0} / 2 + 1,
          ~Word{0}};
}

TEST(zxstkdmp, a_bad_chain_is_told_and_behind_few_frames_the_raw_memory) {
  Words words(1000);
  const Word start = words.end() - 200 * k_word;
  for (std::size_t count = 0; count < 5; ++count) {
    const Word end = lay_frames(start, std::vector<std::size_t>(count, count));
    for (const Word next : wrong_nexts(end)) {
      SCOPED_TRACE(testing::Message() << count << " frames, " << next - end);
      lay_end(end, next, 0x401000);
      const std::string dump = fault_dump(start);
      EXPECT_NE(dump.find("# bad dump_bp\r\n"), dump.npos);
      if (count < 3) {
        EXPECT_NE(dump.find("\r\n# bad dump_bp\r\n------ raw dump start\r\n[" +
                            address(end) + "] "),
                  dump.npos);
      } else {
        EXPECT_TRUE(dump.ends_with("\r\n# bad dump_bp\r\n"));
      }
      expect_fault_dump(words, start);
    }
  }
}

TEST(zxstkdmp, a_frame_may_be_as_large_as_its_bound) {
  Words words(0x30000 / k_word);
  const Word bp = words.begin();
  const Word bound = 0x20000;
  for (const Word size : {bound - k_word, bound}) {
    lay_end(bp, bp + size, 0x401000);
    lay_end(bp + size, words.end(), 0);
    const std::string dump = fault_dump(bp);
    EXPECT_EQ(dump.find('#'), dump.npos) << size;
    expect_fault_dump(words, bp);
  }
}

// Frames that have no room for their own two words.
TEST(zxstkdmp, frames_that_overlap_are_shown_without_words) {
  for (const Word size :
       {Word{1}, Word{3}, k_word, k_word + 1, 2 * k_word - 1}) {
    SCOPED_TRACE(size);
    Words words(1000);
    const Word bp = words.end() - 50 * k_word;
    // The upper frame first: the lower one's two words reach into it, so that
    // it may come out as any kind of end.
    lay_end(bp + size, words.end(), 0x401000);
    lay_end(bp, bp + size, 0x402000);
    expect_fault_dump(words, bp);
  }
}

TEST(zxstkdmp, frames_may_lie_at_any_address) {
  for (Word shift = 1; shift < k_word; ++shift) {
    for (const Word odd : {Word{0}, Word{1}, k_word - 1}) {
      SCOPED_TRACE(testing::Message() << shift << ", " << odd);
      Words words(1000);
      const Word first = words.end() - 50 * k_word + shift;
      const Word second = first + 5 * k_word + odd;
      const Word third = second + 12 * k_word + odd;
      lay_end(first, second, 0x401000);
      lay_end(second, third, 0x402000);
      lay_end(third, third + k_word, 0);
      expect_fault_dump(words, first);
      lay_end(third, 0, 1);
      expect_fault_dump(words, first);
    }
  }
}

TEST(zxstkdmp, a_frame_pointer_to_nothing_is_bad_memory_without_raw) {
  const Words words(1000);
  for (const Word bp :
       {Word{1}, Word{2}, k_word, Word{16}, Word{0x100}, words.end(),
        words.end() + 4096, words.end() - 1, words.end() - k_word + 1, ~Word{0},
        ~Word{0} - 1, ~Word{0} - k_word + 1, ~Word{0} - 2 * k_word}) {
    SCOPED_TRACE(testing::Message() << bp);
    EXPECT_EQ(fault_dump(bp),
              on_disk(frame_head(k_instruction, bp) + "# BadReadPtr\n"));
  }
}

TEST(zxstkdmp, a_frame_that_reaches_into_nothing_is_bad_memory_without_raw) {
  Words words(1000);
  const Word last = words.end() - k_word;
  const struct {
    Word bp;
    Word next;
  } rows[] = {
      {last, words.end()},  // the return address is not there
      {last, words.end() + 100},
      {last - k_word, words.end() + 1},
      {last - k_word, words.end() + k_word},
      {last - 10 * k_word, words.end() + 0x1000},
      {words.begin(), words.end() + 8},
      {words.begin(), words.begin() + 0x20000},
  };
  for (const auto& row : rows) {
    ASSERT_TRUE(!words.stretch().holds(row.bp, 2 * k_word) ||
                !words.stretch().holds(row.bp, row.next - row.bp));
    Words::set_at(row.bp, row.next);
    if (row.bp < last) Words::set_at(row.bp + k_word, 0x401000);
    EXPECT_EQ(fault_dump(row.bp),
              on_disk(frame_head(k_instruction, row.bp) + "# BadReadPtr\n"));
  }
}

TEST(zxstkdmp, a_frame_may_reach_up_to_the_end_of_memory) {
  Words words(1000);
  const Word bp = words.end() - 5 * k_word;
  lay_end(bp, words.end(), 0x401000);
  const std::string dump = fault_dump(bp);
  EXPECT_TRUE(dump.starts_with(on_disk(frame_head(k_instruction, bp) +
                                       frame_head(0x401000, words.end()))));
  EXPECT_TRUE(dump.ends_with("  \r\n# BadReadPtr\r\n"));
  expect_fault_dump(words, bp);
}

TEST(zxstkdmp, frames_ahead_of_bad_memory_are_shown) {
  for (std::size_t count = 1; count < 5; ++count) {
    Words words(1000);
    const Word end =
        lay_frames(words.begin(), std::vector<std::size_t>(count, 9));
    lay_end(end, words.end() + 1, 0x401000);
    Words::set_at(words.end() - k_word, 0);
    expect_fault_dump(words, words.begin());
  }
}

TEST(zxstkdmp, the_walk_stops_at_a_thousand_frames) {
  for (const std::size_t count : {999U, 1000U, 1001U, 1500U}) {
    SCOPED_TRACE(count);
    Words words(3 * count + 1000);
    const Word end =
        lay_frames(words.begin(), std::vector<std::size_t>(count, 1));
    lay_end(end, 0, 1);
    const std::string dump = fault_dump(words.begin());
    expect_fault_dump(words, words.begin());
    EXPECT_EQ(dump.find("\r\n999: [") != dump.npos, count >= 1000);
    EXPECT_EQ(dump.find("\r\n1000: ["), dump.npos);
    EXPECT_EQ(dump.ends_with("# bad dump_bp\r\n"), count < 1000);
  }
}

// Any memory at all: the words are mostly places among themselves.
TEST(zxstkdmp, chains_through_random_memory_end_where_they_must) {
  constexpr unsigned k_seed = 4711;
  std::mt19937 random(k_seed);
  Words words(5000);
  const auto below = [&](Word limit) { return random() % limit; };
  for (int round = 0; round < 100; ++round) {
    SCOPED_TRACE(testing::Message() << "seed " << k_seed << ", " << round);
    const Word step = below(2) == 0 ? 40 * k_word : 400 * k_word;
    for (std::size_t i = 0; i < words.size(); ++i) {
      const Word place = words.at(i) + below(step);
      const Word aligned = place / k_word * k_word;
      words.set(i, below(40) == 0 ? 0 : below(40) == 0 ? place : aligned);
    }
    expect_fault_dump(words, words.at(below(words.size())));
    if (HasFailure()) return;
  }
}

// --------------------------------------------------------- the raw part --

TEST(zxstkdmp, raw_rows_have_four_words_of_32_bits) {
  Words words(1000);
  const char bytes[] = "0123456789ABCDEFabcdefghijklmnop";
  const Word bp = words.end() - 32;
  std::memcpy(reinterpret_cast<void*>(bp), bytes, 32);
  Words::set_at(bp, 0);
  const std::string first = k_word == 8
                                ? "00000000 00000000 42413938 46454443 "
                                : "00000000 37363534 42413938 46454443 ";
  EXPECT_EQ(fault_dump(bp),
            on_disk(frame_head(k_instruction, bp) +
                    "# bad dump_bp\n"
                    "------ raw dump start\n"
                    "[" +
                    address(bp) + "] " + first + "\n[" + address(bp + 16) +
                    "] 64636261 68676665 6C6B6A69 706F6E6D \n"));
}

TEST(zxstkdmp, the_raw_part_ends_with_the_last_32_bytes_of_the_memory) {
  Words words(1000);
  const struct {
    Word ahead_of_end;
    std::size_t rows;
  } rows[] = {{k_word, 0}, {31, 0},     {32, 2},     {33, 2},
              {63, 2},     {64, 4},     {65, 4},     {95, 4},
              {96, 6},     {4096, 256}, {4100, 256}, {8191, 510}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.ahead_of_end);
    const Word bp = words.end() - row.ahead_of_end;
    Words::set_at(bp, 0);
    const std::string dump = fault_dump(bp);
    const std::string start = on_disk(frame_head(k_instruction, bp) +
                                      "# bad dump_bp\n------ raw dump start\n");
    EXPECT_TRUE(dump.starts_with(start));
    EXPECT_EQ(std::count(dump.begin(), dump.end(), '['),
              static_cast<std::ptrdiff_t>(row.rows));
    expect_fault_dump(words, bp);
  }
}

TEST(zxstkdmp, the_raw_part_is_a_megabyte_at_most) {
  constexpr std::size_t k_megabyte = 0x100000;
  Words words(k_megabyte / k_word + 1000);
  const Word start = words.end() - k_megabyte;
  const struct {
    Word bp;
    std::ptrdiff_t rows;
  } rows[] = {{start + 32, 65534}, {start, 65536}, {words.begin(), 65536}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.bp - start);
    Words::set_at(row.bp, 0);
    const std::string dump = fault_dump(row.bp);
    EXPECT_EQ(std::count(dump.begin(), dump.end(), '['), row.rows);
    const Word last_row = row.bp + 16 * static_cast<Word>(row.rows - 1);
    EXPECT_EQ(dump.rfind("\r\n[" + address(last_row)), dump.rfind("\r\n["));
  }
  expect_fault_dump(words, words.begin());
}

// --------------------------------------------------- without a fault --

// Where the frame lies that called dump_stack().
Word calling_frame;

// Calls dump_stack() as if its caller's caller had the frame `made_up`.
[[gnu::noinline, gnu::noipa]] void dump_called_from(Word made_up) {
  auto* const link = static_cast<volatile Word*>(__builtin_frame_address(0));
  calling_frame = reinterpret_cast<Word>(link);
  const Word caller = *link;
  *link = made_up;
  dump_stack(k_check, "message");
  *link = caller;
}

Word read_word(Word place) {
  Word word = 0;
  zxplat::read_memory(place, &word, k_word);
  return word;
}

// The frame of dump_stack(), looked for from a function that it calls: its
// caller is the one that called it.
Word find_frame_of_dump() {
  Word at = reinterpret_cast<Word>(__builtin_frame_address(0));
  for (int i = 0; i < 100 && at != 0; ++i) {
    const Word next = read_word(at);
    if (next == calling_frame) return at;
    at = next;
  }
  ADD_FAILURE() << "no frame of dump_stack()";
  return 0;
}

// All that can be read from an address on, as far as a dump may look.
Stretch stretch_from(Word begin) {
  constexpr Word k_page = 4096;
  constexpr Word k_most = 0x800000;
  Word end = begin / k_page * k_page;
  char byte;
  while (end < begin + k_most && zxplat::read_memory(end, &byte, 1))
    end += k_page;
  return {begin, end};
}

// A dump by `action`, and what it must be by the memory as it is while the
// dump is written.
struct StackDump {
  std::string is;
  std::string should_be;
};

StackDump stack_dump(const std::function<void()>& action,
                     const std::vector<MarkerLine>& markers = {}) {
  const Program program;
  Disk disk;
  StackDump result;
  Word frame = 0;
  disk.at_open = [&] { frame = find_frame_of_dump(); };
  disk.at_close = [&] {
    result.should_be = Model(stretch_from(frame), false, markers).walk(frame);
  };
  action();
  result.is = behind_head(disk.bytes());
  return result;
}

void expect_as_it_should_be(const StackDump& dump) {
  EXPECT_FALSE(dump.should_be.empty());
  EXPECT_TRUE(same_text(dump.is, on_disk(dump.should_be)));
}

// Words on the stack itself, above the frames of what is called with them.
struct StackWords {
  Word words[600];

  Word at(std::size_t i) const {
    return reinterpret_cast<Word>(words) + i * k_word;
  }
};

// Dumps from below a made-up chain: frames of the given sizes, and what is
// read where they end.
[[gnu::noinline]] StackDump dump_below_chain(
    const std::vector<std::size_t>& sizes,
    const std::function<Word(Word)>& next, Word return_address) {
  StackWords stack;
  for (std::size_t i = 0; i < std::size(stack.words); ++i)
    stack.words[i] = Words::value(i);
  const Word end = lay_frames(stack.at(5), sizes);
  lay_end(end, next(end), return_address);
  return stack_dump([&] { dump_called_from(stack.at(5)); });
}

std::size_t count_of(std::string_view text, std::string_view what) {
  std::size_t count = 0;
  for (std::size_t at = text.find(what); at != text.npos;
       at = text.find(what, at + 1))
    ++count;
  return count;
}

TEST(zxstkdmp, a_chain_that_ends_normally_is_followed_by_the_raw_stack) {
  for (std::size_t count = 0; count < 5; ++count) {
    SCOPED_TRACE(count);
    const StackDump dump = dump_below_chain(
        std::vector<std::size_t>(count, count),
        [](Word end) { return end + 4 * k_word; }, 0);
    expect_as_it_should_be(dump);
    // The frames of dump_stack() and of its caller come first.
    EXPECT_EQ(count_of(dump.is, "------ ret @ADDR "), 2 + count);
    EXPECT_EQ(count_of(dump.is, "\r\n------ raw dump start\r\n["), 1U);
    EXPECT_EQ(count_of(dump.is, "#"), 0U);
    EXPECT_GT(count_of(dump.is, "\r\n["), 10U);
  }
}

TEST(zxstkdmp, a_bad_chain_shows_the_raw_stack_below_three_frames_alone) {
  for (std::size_t count = 0; count < 4; ++count) {
    SCOPED_TRACE(count);
    const StackDump dump = dump_below_chain(
        std::vector<std::size_t>(count, 5), [](Word) { return Word{0}; },
        0x401000);
    expect_as_it_should_be(dump);
    EXPECT_EQ(count_of(dump.is, "------ ret @ADDR "), 2 + count);
    EXPECT_EQ(count_of(dump.is, "\r\n# bad dump_bp\r\n"), 1U);
    EXPECT_EQ(count_of(dump.is, "raw dump"), count == 0 ? 1U : 0U);
  }
}

TEST(zxstkdmp, a_wrong_word_for_a_check_is_told_and_ends_the_dump) {
  for (const std::uint32_t check : {0x1235U, 0U, 0x12340000U, 0xFFFFFFFFU}) {
    SCOPED_TRACE(check);
    const Program program;
    Program::module_lines = {"a module\n"};
    const Disk disk;
    dump_stack(check, "message");
    EXPECT_EQ(behind_head(disk.bytes()),
              "a module\r\n"
              "dump_stack - bad argument found on stack - "
              "dump not created\r\n");
    EXPECT_EQ(events,
              (Events{"open D:\\START\\PROG.dmp", "module lines", "close"}));
  }
}

TEST(zxstkdmp, a_fault_needs_no_word_for_a_check) {
  const Program program;
  const Disk disk;
  stack_dump_fault = {true, 0, k_instruction};
  dump_stack(0x1235, "message");
  EXPECT_EQ(behind_head(disk.bytes()), on_disk(frame_head(k_instruction, 0)));
}

TEST(zxstkdmp, a_dump_without_a_message_has_an_empty_one) {
  const Program program;
  const Disk disk;
  dump_stack(k_check, nullptr);
  const std::string dump = disk.bytes();
  EXPECT_TRUE(dump.starts_with(head_with("") + "------ ret @ADDR "))
      << dump.substr(0, 200);
}

TEST(zxstkdmp, module_lines_stand_between_the_message_and_the_first_frame) {
  const Program program;
  Program::module_lines = {"@MOD one", " 1\n", "", "@MOD two\n"};
  const Disk disk;
  dump_stack(k_check, "message");
  EXPECT_TRUE(behind_head(disk.bytes())
                  .starts_with("@MOD one 1\r\n@MOD two\r\n------ ret @ADDR "));
  EXPECT_EQ(events,
            (Events{"open D:\\START\\PROG.dmp", "module lines", "close"}));
}

TEST(zxstkdmp, a_fault_has_no_module_lines) {
  const Program program;
  Program::module_lines = {"@MOD one\n"};
  const Disk disk;
  dump_fault(0);
  EXPECT_EQ(behind_head(disk.bytes()), on_disk(frame_head(k_instruction, 0)));
  EXPECT_EQ(events, (Events{"open D:\\START\\PROG.dmp", "close"}));
}

// ----------------------------------------------------- real frames --

// A frame as the dump shows it.
struct Shown {
  std::vector<std::string> markers;
  Word return_address = 0;
  Word bp = 0;
  std::vector<Word> words;
};

// Reads the frames of a dump up to the first line that belongs to none.
std::vector<Shown> frames_in(const std::string& text) {
  std::vector<Shown> frames;
  std::vector<std::string> markers;
  std::size_t start = 0;
  for (std::size_t end = text.find("\r\n"); end != text.npos;
       start = end + 2, end = text.find("\r\n", start)) {
    const std::string line = text.substr(start, end - start);
    if (line.starts_with("@APP ")) {
      markers.push_back(line.substr(5));
    } else if (line.starts_with("------ ret @ADDR ")) {
      Shown frame;
      frame.markers = std::move(markers);
      markers.clear();
      EXPECT_EQ(std::sscanf(line.c_str(),
                            "------ ret @ADDR %" SCNxPTR "   BP: %" SCNxPTR,
                            &frame.return_address, &frame.bp),
                2);
      frames.push_back(frame);
    } else if (line.find(": [") == 2) {
      const char* rest = line.c_str() + line.find(']') + 1;
      Word word = 0;
      int used = 0;
      while (std::sscanf(rest, " %" SCNxPTR "%n", &word, &used) == 1) {
        frames.back().words.push_back(word);
        rest += used;
      }
    } else if (!line.empty()) {
      break;
    }
  }
  return frames;
}

class Saying : public zxFrameMarker {
 public:
  explicit Saying(const char* words, std::int32_t value = 0)
      : zxFrameMarker(value), text(words) {}
  zxStr describe() const override { return text; }

 private:
  const char* text;
};

// A chain of three real functions, each with a word in its frame by which it
// is known, and the last two with markers.
constexpr Word k_word_of_first = 0x5AFE0001;
constexpr Word k_word_of_second = 0x5AFE0002;
constexpr Word k_word_of_third = 0x5AFE0003;

struct Step {
  Word frame;
  Word return_address;
};
Step first_step;
Step second_step;
Step third_step;
std::vector<MarkerLine> real_markers;

// What is not these functions' own is elsewhere, so that they are short and
// an address in them is known by its distance from their start.
[[gnu::noinline]] void expect_kept(Word known, Word value) {
  EXPECT_EQ(known, value);
}

[[gnu::noinline]] void note_markers(const Saying& inner, const Saying& outer) {
  real_markers = {{reinterpret_cast<Word>(&inner), "inner of second"},
                  {reinterpret_cast<Word>(&outer), "outer of second"}};
}

[[gnu::noinline, gnu::noipa]] void third() {
  const volatile Word known = k_word_of_third;
  third_step = {reinterpret_cast<Word>(__builtin_frame_address(0)),
                reinterpret_cast<Word>(__builtin_return_address(0))};
  calling_frame = third_step.frame;
  dump_stack(k_check, "message");
  expect_kept(known, k_word_of_third);
}

[[gnu::noinline, gnu::noipa]] void second() {
  const volatile Word known = k_word_of_second;
  second_step = {reinterpret_cast<Word>(__builtin_frame_address(0)),
                 reinterpret_cast<Word>(__builtin_return_address(0))};
  const Saying outer("outer of second");
  const Saying inner("inner of second");
  note_markers(inner, outer);
  third();
  expect_kept(known, k_word_of_second);
}

[[gnu::noinline, gnu::noipa]] void first() {
  const volatile Word known = k_word_of_first;
  first_step = {reinterpret_cast<Word>(__builtin_frame_address(0)),
                reinterpret_cast<Word>(__builtin_return_address(0))};
  second();
  expect_kept(known, k_word_of_first);
}

bool lies_in(Word place, void (*function)()) {
  constexpr Word k_most = 2048;  // bytes of code of such a function
  const Word start = reinterpret_cast<Word>(function);
  return place > start && place - start < k_most;
}

// The markers lie in the frame of second() whatever the order in which the
// compiler puts them there, hence the model alone for these lines.
StackDump dump_of_real_frames() {
  const Program program;
  Disk disk;
  StackDump result;
  Word frame = 0;
  disk.at_open = [&] { frame = find_frame_of_dump(); };
  disk.at_close = [&] {
    result.should_be =
        Model(stretch_from(frame), false, real_markers).walk(frame);
  };
  first();
  result.is = behind_head(disk.bytes());
  return result;
}

TEST(zxstkdmp, a_real_stack_is_walked_from_dump_stack_to_its_callers) {
  const StackDump dump = dump_of_real_frames();
  const std::vector<Shown> frames = frames_in(dump.is);
  ASSERT_GE(frames.size(), 4U);
  EXPECT_TRUE(lies_in(frames[0].return_address, third));
  EXPECT_EQ(frames[1].return_address, third_step.return_address);
  EXPECT_TRUE(lies_in(frames[1].return_address, second));
  EXPECT_EQ(frames[2].return_address, second_step.return_address);
  EXPECT_TRUE(lies_in(frames[2].return_address, first));
  EXPECT_EQ(frames[3].return_address, first_step.return_address);
  EXPECT_EQ(frames[0].bp, third_step.frame);
  EXPECT_EQ(frames[1].bp, second_step.frame);
  EXPECT_EQ(frames[2].bp, first_step.frame);
  for (std::size_t i = 1; i < frames.size(); ++i) {
    EXPECT_GT(frames[i].bp, frames[i - 1].bp);
    EXPECT_EQ(frames[i].words.size(),
              (frames[i].bp - frames[i - 1].bp) / k_word - 2);
  }
}

TEST(zxstkdmp, the_words_of_a_real_frame_hold_the_functions_variables) {
  const std::vector<Shown> frames = frames_in(dump_of_real_frames().is);
  ASSERT_GE(frames.size(), 3U);
  const Word known[] = {k_word_of_third, k_word_of_second, k_word_of_first};
  for (std::size_t i = 0; i < 3; ++i) {
    const std::vector<Word>& words = frames[i].words;
    EXPECT_GE(std::count(words.begin(), words.end(), known[i]), 1) << i;
  }
}

TEST(zxstkdmp, all_of_a_real_stack_is_shown_as_it_is) {
  expect_as_it_should_be(dump_of_real_frames());
}

// ------------------------------------------------------------- markers --

TEST(zxstkdmp, markers_stand_ahead_of_the_frame_in_which_they_lie) {
  const std::vector<Shown> frames = frames_in(dump_of_real_frames().is);
  ASSERT_GE(frames.size(), 3U);
  EXPECT_EQ(frames[0].markers, std::vector<std::string>{});
  EXPECT_EQ(frames[1].markers,
            (std::vector<std::string>{"inner of second", "outer of second"}));
  EXPECT_EQ(frames[2].markers, std::vector<std::string>{});
}

TEST(zxstkdmp, a_marker_has_its_value_its_place_and_the_one_below) {
  EXPECT_EQ(frame_markers, nullptr);
  {
    const Saying outer("outer", 7);
    EXPECT_EQ(outer.data, 7);
    EXPECT_EQ(outer.stack_pos, reinterpret_cast<Word>(&outer));
    EXPECT_EQ(outer.next, nullptr);
    EXPECT_EQ(frame_markers, &outer);
    {
      const Saying inner("inner");
      EXPECT_EQ(inner.data, 0);
      EXPECT_EQ(inner.stack_pos, reinterpret_cast<Word>(&inner));
      EXPECT_EQ(inner.next, &outer);
      EXPECT_EQ(frame_markers, &inner);
    }
    EXPECT_EQ(frame_markers, &outer);
    const Saying negative("negative", INT32_MIN);
    EXPECT_EQ(negative.data, INT32_MIN);
    EXPECT_EQ(frame_markers, &negative);
  }
  EXPECT_EQ(frame_markers, nullptr);
}

// The frames of a dump from below a made-up chain of four frames, with
// markers that lie where `place` says, the innermost one first: 0 is the
// made-up frame that begins the chain, 1 the next and so on.
struct Put {
  std::size_t frame;
  std::ptrdiff_t offset;
  const char* text;
};

[[gnu::noinline]] StackDump dump_with_markers(const std::vector<Put>& puts) {
  StackWords stack;
  std::fill(std::begin(stack.words), std::end(stack.words), Word{0x77});
  // Frame i begins at word 10 + 20 * i.
  lay_end(lay_frames(stack.at(10), {18, 18, 18, 18}), 0, 1);
  std::vector<MarkerLine> lines;
  std::vector<std::unique_ptr<Saying>> markers;
  for (const Put& put : puts) {
    const Word frame = stack.at(10 + 20 * put.frame);
    lines.push_back({frame + static_cast<Word>(put.offset), put.text});
  }
  for (std::size_t i = puts.size(); i > 0; --i) {
    markers.push_back(std::make_unique<Saying>(puts[i - 1].text));
    markers.back()->stack_pos = lines[i - 1].place;
  }
  const StackDump dump =
      stack_dump([&] { dump_called_from(stack.at(10)); }, lines);
  while (!markers.empty()) markers.pop_back();
  return dump;
}

TEST(zxstkdmp, a_marker_belongs_to_the_frame_that_ends_at_or_above_it) {
  // The frames of the dump are numbered from that of dump_stack(); 2 is the
  // one that reaches from made-up frame 0 up to made-up frame 1.
  const struct {
    std::vector<Put> puts;
    std::vector<std::vector<std::string>> lines;
  } rows[] = {
      {{{0, 1, "a"}}, {{}, {}, {"a"}, {}, {}, {}}},
      {{{1, -1, "a"}}, {{}, {}, {"a"}, {}, {}, {}}},
      {{{1, 0, "a"}}, {{}, {}, {"a"}, {}, {}, {}}},
      {{{1, 1, "a"}}, {{}, {}, {}, {"a"}, {}, {}}},
      {{{0, 0, "a"}}, {{}, {"a"}, {}, {}, {}, {}}},
      {{{0, 8, "a"}, {1, 8, "b"}, {1, 16, "c"}, {3, 8, "d"}},
       {{}, {}, {"a"}, {"b", "c"}, {}, {"d"}}},
      // What lies above all frames has no line.
      {{{2, 8, "a"}, {4, 8, "b"}}, {{}, {}, {}, {}, {"a"}, {}}},
      // A marker waits for those ahead of it, wherever it lies itself.
      {{{2, 8, "a"}, {0, 8, "b"}}, {{}, {}, {}, {}, {"a", "b"}, {}}},
      {{{4, 8, "a"}, {0, 8, "b"}}, {{}, {}, {}, {}, {}, {}}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    const StackDump dump = dump_with_markers(row.puts);
    expect_as_it_should_be(dump);
    std::vector<std::vector<std::string>> lines;
    for (const Shown& frame : frames_in(dump.is))
      lines.push_back(frame.markers);
    EXPECT_EQ(lines, row.lines);
  }
  EXPECT_EQ(frame_markers, nullptr);
}

TEST(zxstkdmp, every_dump_shows_the_markers_anew) {
  const Saying marker("still here");
  for (int i = 0; i < 3; ++i) {
    const Program program;
    const Disk disk;
    dump_stack(k_check, "message");
    EXPECT_EQ(count_of(disk.bytes(), "\r\n@APP still here\r\n"), 1U);
  }
}

TEST(zxstkdmp, a_fault_has_no_lines_of_markers) {
  Words words(1000);
  lay_end(lay_frames(words.begin(), {3, 3, 3}), words.end(), 0);
  Saying marker("not here");
  marker.stack_pos = words.at(1);
  const std::string dump = fault_dump(words.begin());
  EXPECT_EQ(count_of(dump, "------ ret @ADDR "), 4U);
  EXPECT_EQ(count_of(dump, "@APP"), 0U);
}

// The lines of the dump of a marker that lies here.
std::string dump_with(const Saying&) {
  const Program program;
  const Disk disk;
  dump_stack(k_check, "message");
  return behind_head(disk.bytes());
}

TEST(zxstkdmp, the_text_of_a_marker_is_whatever_it_is) {
  const struct {
    const char* text;
    const char* line;
  } rows[] = {
      {"", "@APP \r\n------ ret"},
      {"%s%n %d", "@APP %s%n %d\r\n------ ret"},
      {"two\nlines", "@APP two\r\nlines\r\n------ ret"},
      {"\xF9\xEC\xE5\xED", "@APP \xF9\xEC\xE5\xED\r\n------ ret"},
  };
  for (const auto& row : rows) {
    const Saying marker(row.text);
    EXPECT_EQ(count_of(dump_with(marker), row.line), 1U) << row.line;
  }
}

TEST(zxstkdmp, a_long_text_of_a_marker_is_cut_in_bounds) {
  for (const std::size_t length : {500U, 1023U, 1024U, 5000U, 100'000U}) {
    SCOPED_TRACE(length);
    const std::string text(length, 'x');
    const Saying marker(text.c_str());
    const std::string dump = dump_with(marker);
    const std::size_t start = dump.find("@APP ");
    ASSERT_NE(start, dump.npos);
    const std::size_t end = dump.find_first_not_of('x', start + 5);
    EXPECT_EQ(dump.substr(end, 19), "\r\n------ ret @ADDR ");
    const std::size_t shown = end - start - 5;
    EXPECT_GE(shown, std::min<std::size_t>(length, 500));
    EXPECT_LE(shown, length);
    EXPECT_EQ(count_of(dump, "@APP "), 1U);
  }
}

class Failing : public zxFrameMarker {
 public:
  zxStr describe() const override {
    bail_code(1012);
    zxStr text = "failed ";
    text.at(1000) = 'x';
    ZX_ASSERT(text.is_empty());
    return text;
  }
};

TEST(zxstkdmp, a_marker_that_fails_while_it_is_asked_is_shown_all_the_same) {
  const Failing marker;
  const Saying above("above");
  std::string dump;
  kit::with_failures_dropped([&] { dump = dump_with(above); });
  EXPECT_EQ(count_of(dump, "\r\n@APP failed \r\n"), 1U);
  EXPECT_EQ(count_of(dump, "\r\n@APP above\r\n"), 1U);
  EXPECT_GE(frames_in(dump).size(), 3U);
}

std::vector<const zxFrameMarker*> marker_list() {
  std::vector<const zxFrameMarker*> list;
  for (const zxFrameMarker* at = frame_markers; at != nullptr; at = at->next)
    list.push_back(at);
  return list;
}

using List = std::vector<const zxFrameMarker*>;

TEST(zxstkdmp, markers_are_pushed_and_popped_at_the_front) {
  Saying a("a");
  Saying b("b");
  EXPECT_EQ(marker_list(), (List{&b, &a}));
  pop_frame_marker(&b);
  EXPECT_EQ(marker_list(), (List{&a}));
  pop_frame_marker(&a);
  EXPECT_EQ(marker_list(), List{});
  push_frame_marker(&a);
  push_frame_marker(&b);
  EXPECT_EQ(marker_list(), (List{&b, &a}));
  EXPECT_EQ(b.next, &a);
  EXPECT_EQ(a.next, nullptr);
}

TEST(zxstkdmp, popping_a_marker_below_the_front_fails_and_takes_it_out) {
  for (const int which : {0, 1}) {
    SCOPED_TRACE(which);
    Saying a("a");
    Saying b("b");
    Saying c("c");
    Saying* const popped = which == 0 ? &a : &b;
    EXPECT_ASSERTION(pop_frame_marker(popped), "zxstkdmp");
    const List rest = which == 0 ? List{&c, &b} : List{&c, &a};
    EXPECT_EQ(marker_list(), rest);
    // The list takes new markers and gives them back.
    {
      const Saying d("d");
      EXPECT_EQ(marker_list(), List{&d} + rest);
    }
    EXPECT_EQ(marker_list(), rest);
    const StackDump dump = stack_dump([&] { third(); });
    EXPECT_EQ(count_of(dump.is, "@APP "), 2U);
    // For the destructors, which pop from the last to the first.
    while (frame_markers != nullptr) pop_frame_marker(frame_markers);
    for (Saying* marker : {&a, &b, &c}) push_frame_marker(marker);
  }
  EXPECT_EQ(frame_markers, nullptr);
}

TEST(zxstkdmp, popping_a_marker_that_is_not_in_the_list_fails) {
  Saying a("a");
  Saying b("b");
  pop_frame_marker(&b);
  EXPECT_ASSERTION(pop_frame_marker(&b), "zxstkdmp");
  EXPECT_EQ(marker_list(), List{&a});
  pop_frame_marker(&a);
  EXPECT_ASSERTION(pop_frame_marker(&b), "zxstkdmp");
  EXPECT_EQ(marker_list(), List{});
  kit::with_failures_dropped([&] { pop_frame_marker(&a); });
  EXPECT_EQ(marker_list(), List{});
  push_frame_marker(&a);
  push_frame_marker(&b);
}

TEST(zxstkdmp, markers_that_are_destroyed_in_a_wrong_order_leave_a_list) {
  auto a = std::make_unique<Saying>("a");
  auto b = std::make_unique<Saying>("b");
  auto c = std::make_unique<Saying>("c");
  kit::with_failures_dropped([&] { b.reset(); });
  EXPECT_EQ(marker_list(), (List{c.get(), a.get()}));
  kit::with_failures_dropped([&] { a.reset(); });
  EXPECT_EQ(marker_list(), List{c.get()});
  c.reset();
  EXPECT_EQ(marker_list(), List{});
}

// ----------------------------------------------------------- processes --

std::string name_of_this_program() {
  std::string name = fs::path(kit::self_path()).stem().string();
  for (char& c : name)
    c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  return name.substr(0, 20);
}

// What a process of this program writes, up to the first frame.
std::string head_of_process(const std::string& path, const std::string& version,
                            const std::string& message) {
  return "@!STKDMP\r\r\n\r\n"
         "-------------------STACK DUMP-------------------\r\n"
         "@ENV:WIN32\r\n@PROG:" +
         path + "\r\n@VER:" + version + "\r\n@ERR:" + message + "\r\n";
}

void fail_in_process() {
  bail_wait_seconds = 0;
  zxplat::set_last_error(2);
  bail_code(1004, "x");
}

constexpr char k_message_of_process[] =
    "1004: create: Can't open file 'x' for writing [1004-1004-0/2-0/2/x/]";

void expect_dump_of_process(const std::string& dump) {
  const std::string head =
      head_of_process(kit::self_path(), std::string(program_version.view()),
                      k_message_of_process);
  ASSERT_TRUE(dump.starts_with(head + "------ ret @ADDR "))
      << dump.substr(0, 500);
  const std::vector<Shown> frames = frames_in(dump.substr(head.size()));
  ASSERT_GE(frames.size(), 1U);
  for (std::size_t i = 1; i < frames.size(); ++i)
    EXPECT_GT(frames[i].bp, frames[i - 1].bp);
}

ZX_CASE(zxstkdmp_fails) {
  init_zxlib_args(argc, argv);
  fail_in_process();
  return 5;
}

TEST(zxstkdmp, a_failing_program_leaves_its_dump_in_its_directory) {
  const TempDir dir;
  kit::ProcessOptions options;
  options.directory = dir.path();
  const auto result = kit::run_case("zxstkdmp_fails", {}, options);
  EXPECT_EQ(result.exit_code, 100);
  const std::string name = name_of_this_program() + ".dmp";
  ASSERT_EQ(names_in(dir.path()), std::vector<std::string>{name});
  expect_dump_of_process(kit::read_file(dir.file(name)));
}

ZX_CASE(zxstkdmp_fails_elsewhere) {
  init_zxlib_args(argc, argv);
  fs::current_path("elsewhere");
  fail_in_process();
  return 5;
}

TEST(zxstkdmp, the_dump_stands_where_the_program_was_started) {
  const TempDir dir;
  fs::create_directory(dir.file("elsewhere"));
  kit::ProcessOptions options;
  options.directory = dir.path();
  const auto result = kit::run_case("zxstkdmp_fails_elsewhere", {}, options);
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_TRUE(fs::is_empty(dir.file("elsewhere")));
  expect_dump_of_process(
      kit::read_file(dir.file(name_of_this_program() + ".dmp")));
}

// Fails ahead of the library's start, when nothing above the dump is there.
ZX_CASE(zxstkdmp_fails_early) {
  const Saying marker("nobody asks");
  fail_in_process();
  return 5;
}

TEST(zxstkdmp, a_program_that_fails_early_has_a_dump_without_names) {
  const TempDir dir;
  kit::ProcessOptions options;
  options.directory = dir.path();
  const auto result = kit::run_case("zxstkdmp_fails_early", {}, options);
  EXPECT_EQ(result.exit_code, 100);
  ASSERT_EQ(names_in(dir.path()), std::vector<std::string>{"zxstack.dmp"});
  const std::string dump = kit::read_file(dir.file("zxstack.dmp"));
  const std::string head = head_of_process("", "", k_message_of_process);
  ASSERT_TRUE(dump.starts_with(head + "------ ret @ADDR "));
  EXPECT_EQ(count_of(dump, "\r\n@APP \r\n------ ret @ADDR "), 1U);
}

// Fails with every descriptor taken, and a text still to be written down.
ZX_CASE(zxstkdmp_fails_without_descriptor) {
  init_zxlib_args(argc, argv);
  const kit::FewFiles few(64);
  zxStream* const text = zxStream::open("text", zxplat::OpenMode::create);
  text->write("written down", 12);
  int count = 0;
  while (zxStream::open("nul", zxplat::OpenMode::read) != nullptr) ++count;
  if (zxplat::last_error() != zxplat::k_err_too_many_open || count < 10)
    return 6;
  fail_in_process();
  return 5;
}

TEST(zxstkdmp, a_program_without_a_descriptor_left_has_its_dump) {
  const TempDir dir;
  kit::ProcessOptions options;
  options.directory = dir.path();
  const auto result =
      kit::run_case("zxstkdmp_fails_without_descriptor", {}, options);
  EXPECT_EQ(result.exit_code, 100) << result.err;
  const std::string name = name_of_this_program() + ".dmp";
  ASSERT_EQ(names_in(dir.path()), (std::vector<std::string>{name, "text"}));
  EXPECT_EQ(kit::read_file(dir.file("text")), "written down");
  expect_dump_of_process(kit::read_file(dir.file(name)));
}

}  // namespace
