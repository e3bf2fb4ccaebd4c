// zxstkdmp.cpp - the stack dump.
// Tests: tests/zxlib/zxstkdmp_test.cpp.
#include "zxstkdmp.h"

#include <algorithm>
#include <cstring>

#include "zxatsys.h"
#include "zxplat.h"

namespace {

using Word = std::uintptr_t;

constexpr std::uint32_t k_check = 0x1234;

// Bounds of the walk: what is above them is no frame.
constexpr int k_max_frames = 1000;
constexpr Word k_max_frame_size = 0x20000;
constexpr std::size_t k_words_per_row = 8;
// A chain that breaks this early says little; the raw stack may say more.
constexpr int k_telling_frames = 3;

// More markers than any program has at a time: a list that goes on is broken.
constexpr int k_max_markers = 1000;

constexpr std::size_t k_raw_words = 0x40000;
constexpr std::size_t k_raw_step = 32;  // bytes, probed together

constexpr std::size_t k_name_room = zxplat::k_max_name + 1;
constexpr std::size_t k_description_room = 1024;

const char* no_directory() { return ""; }
void no_files() {}
void no_description(const zxFrameMarker&, zxText&) {}
void no_module_lines(void (*)(std::string_view)) {}

// ------------------------------------------------------------- the file --

// The dump file: text with its line feeds written as CR LF.  A write that
// fails goes unnoticed, but for the first line.
class DumpFile {
 public:
  bool is_open() const { return fd != zxplat::k_no_fd; }

  bool open(std::string_view name) {
    used = 0;
    fd = zxplat::files.open(name, zxplat::OpenMode::create);
    return is_open();
  }

  void write(std::string_view text) {
    for (const char c : text) {
      if (c == '\n') put('\r');
      put(c);
    }
  }

  void flush() {
    const std::size_t size = used;
    used = 0;
    zxplat::write_all(fd, {buffer, size});
  }

  void close() {
    flush();
    zxplat::files.close(fd);
    fd = zxplat::k_no_fd;
  }

 private:
  void put(char c) {
    if (used == sizeof buffer) flush();
    buffer[used++] = c;
  }

  zxplat::Fd fd = zxplat::k_no_fd;
  std::size_t used = 0;
  char buffer[4096] = {};
};

// In static memory: the stack and the heap may be what failed.
constinit DumpFile dump_file;

void write_line(std::string_view before, std::string_view text) {
  dump_file.write(before);
  dump_file.write(text);
  dump_file.write("\n");
}

// The file's base name with its ending, at most some hundred bytes.
void add_base_name(zxText& out) {
  constexpr std::size_t k_shown = 256;
  const char* name = bail_hooks.program_name();
  out.add(*name != '\0' ? name : "zxstack", k_shown);
  out.add(".dmp");
}

enum class Try { done, next_place, give_up };

// A disk that takes the file but not its first line is passed over.
Try try_to_open(std::string_view name) {
  if (!dump_file.open(name)) return Try::give_up;
  zxplat::set_last_error(zxplat::k_err_none);
  dump_file.write("@!STKDMP\r\n");
  dump_file.flush();
  if (zxplat::last_error() == zxplat::k_err_none) return Try::done;
  dump_file.close();
  return Try::next_place;
}

Try try_drive(char letter) {
  char name[k_name_room];
  zxText text(name);
  text.add({&letter, 1});
  text.add(":\\");
  add_base_name(text);
  return try_to_open(text.view());
}

Try try_program_directory() {
  char name[k_name_room];
  zxText text(name);
  add_stack_dump_name(text);
  return try_to_open(text.view());
}

Try try_working_directory() {
  char name[k_name_room];
  zxText text(name);
  add_base_name(text);
  return try_to_open(text.view());
}

bool open_dump_file() {
  Try result = try_program_directory();
  for (char drive = 'C'; drive <= 'Z' && result == Try::next_place; ++drive)
    result = try_drive(drive);
  if (result == Try::next_place) result = try_working_directory();
  return result == Try::done;
}

bool open_dump_file_somehow() {
  if (open_dump_file()) return true;
  stack_dump_hooks.close_files();
  return open_dump_file();
}

// ------------------------------------------------------------- the walk --

bool can_read(Word from, std::size_t size) {
  // A byte of each page tells of the whole page, on any system.
  constexpr std::size_t k_page = 4096;
  char byte;
  for (std::size_t at = 0; at < size; at += k_page)
    if (!zxplat::read_memory(from + at, &byte, 1)) return false;
  return size == 0 || zxplat::read_memory(from + size - 1, &byte, 1);
}

struct Frame {
  Word next;            // the caller's frame pointer
  Word return_address;  // into the caller
};

enum class Ending { bad_chain, bad_memory, top_of_stack, too_deep };

class Walk {
 public:
  Walk(Word start, bool of_fault) : bp(start), in_fault(of_fault) {}

  void run() {
    const Ending ending = walk_frames();
    if (ending == Ending::bad_chain) dump_file.write("# bad dump_bp\n");
    if (ending == Ending::bad_memory) dump_file.write("# BadReadPtr\n");
    const bool says_little =
        ending == Ending::bad_chain && frames < k_telling_frames;
    const bool ended_normally = ending == Ending::top_of_stack && !in_fault;
    if (says_little || ended_normally) write_raw();
  }

 private:
  Ending walk_frames() {
    for (frames = 0; frames < k_max_frames; ++frames) {
      Frame frame;
      if (!zxplat::read_memory(bp, &frame.next, sizeof(Word)))
        return Ending::bad_memory;
      if (frame.next <= bp || frame.next - bp > k_max_frame_size)
        return Ending::bad_chain;
      if (!can_read(bp, frame.next - bp) ||
          !zxplat::read_memory(bp + sizeof(Word), &frame.return_address,
                               sizeof(Word)))
        return Ending::bad_memory;
      if (frame.return_address == 0) return Ending::top_of_stack;
      if (!in_fault) write_markers_up_to(frame.next);
      write_frame(frame);
      bp = frame.next;
    }
    return Ending::too_deep;
  }

  // The lines of the markers that lie in this frame.
  void write_markers_up_to(Word end) {
    for (; can_follow_cursor() && cursor->stack_pos <= end;
         cursor = cursor->next, ++markers) {
      char room[k_description_room];
      zxText text(room);
      dump_file.flush();  // the description is not ours
      stack_dump_hooks.describe(*cursor, text);
      write_line("@APP ", text.view());
    }
  }

  // True if there is a marker at the cursor, as far as can be told: its bytes
  // can be read, and so can the table of functions that they begin with.
  bool can_follow_cursor() const {
    alignas(zxFrameMarker) char bytes[sizeof(zxFrameMarker)];
    Word table;
    if (cursor == nullptr || markers >= k_max_markers ||
        !zxplat::read_memory(reinterpret_cast<Word>(cursor), bytes,
                             sizeof bytes))
      return false;
    std::memcpy(&table, bytes, sizeof table);
    return zxplat::read_memory(table, &table, sizeof table);
  }

  void write_frame(const Frame& frame) {
    write_frame_head(frame.return_address, frame.next);
    std::size_t column = 0;
    for (Word at = bp + 2 * sizeof(Word); at + sizeof(Word) <= frame.next;
         at += sizeof(Word)) {
      if (column == 0) write_row_head(at);
      write_word(at);
      column = (column + 1) % k_words_per_row;
    }
    dump_file.write("\n");
    dump_file.flush();
  }

  void write_row_head(Word at) const {
    char room[48];
    zxText text(room);
    text.add("\n");
    text.add_int(frames, 2);
    text.add(": [");
    text.add_address(at);
    text.add("] ");
    dump_file.write(text.view());
  }

  static void write_word(Word at) {
    Word word = 0;
    zxplat::read_memory(at, &word, sizeof word);
    char room[24];
    zxText text(room);
    text.add_hex(word, 2 * sizeof word, false);
    text.add("  ");
    dump_file.write(text.view());
  }

  // The stack as it lies there, where the chain of frames does not tell.
  void write_raw() {
    dump_file.write("------ raw dump start\n");
    std::uint32_t words[k_raw_step / sizeof(std::uint32_t)];
    constexpr std::size_t k_half = std::size(words) / 2;
    for (std::size_t done = 0; done < k_raw_words; done += std::size(words)) {
      if (!zxplat::read_memory(bp, words, sizeof words)) return;
      write_raw_row(bp, words);
      write_raw_row(bp + k_raw_step / 2, words + k_half);
      bp += k_raw_step;
    }
  }

  static void write_raw_row(Word at, const std::uint32_t* words) {
    char room[64];
    zxText text(room);
    text.add("[");
    text.add_address(at);
    text.add("] ");
    for (int i = 0; i < 4; ++i) {
      text.add_hex(words[i], 8);
      text.add(" ");
    }
    text.add("\n");
    dump_file.write(text.view());
  }

 public:
  static void write_frame_head(Word return_address, Word next) {
    char room[80];
    zxText text(room);
    text.add("------ ret @ADDR ");
    text.add_address(return_address);
    text.add("   BP: ");
    text.add_address(next);
    text.add("\n");
    dump_file.write(text.view());
  }

 private:
  Word bp;
  int frames = 0;
  bool in_fault;
  const zxFrameMarker* cursor = frame_markers;
  int markers = 0;
};

// ------------------------------------------------------------- the parts --

void write_head(const char* message) {
  dump_file.write("\n-------------------STACK DUMP-------------------\n");
  write_line("@ENV:", "WIN32");
  write_line("@PROG:", bail_hooks.program_path());
  write_line("@VER:", bail_hooks.program_version());
  write_line("@ERR:", message != nullptr ? message : "");
}

void write_fault(const StackDumpFault& fault) {
  Walk::write_frame_head(fault.instruction, fault.frame);
  if (fault.frame != 0) Walk(fault.frame, true).run();
}

// True if the frame is that of dump_stack() called with the check word.
// Where arguments travel in registers the parameter itself must do.
bool is_own_frame(Word frame, std::uint32_t check) {
  std::uint32_t argument = check;
  if constexpr (sizeof(Word) == 4) {
    if (!zxplat::read_memory(frame + 2 * sizeof(Word), &argument,
                             sizeof argument))
      return false;
  }
  return argument == k_check;
}

void write_stack(Word frame, std::uint32_t check) {
  stack_dump_hooks.write_module_lines(
      [](std::string_view text) { dump_file.write(text); });
  if (is_own_frame(frame, check))
    Walk(frame, false).run();
  else
    dump_file.write(
        "dump_stack - bad argument found on stack - dump not created\n");
}

}  // namespace

constinit zxFrameMarker* frame_markers = nullptr;
constinit StackDumpFault stack_dump_fault = {};
constinit StackDumpHooks stack_dump_hooks = {no_directory, no_files,
                                             no_description, no_module_lines};

void add_stack_dump_name(zxText& out) {
  out.add(stack_dump_hooks.directory());
  add_base_name(out);
}

// A function with a frame of its own, whose argument is where the caller's
// convention puts it.
[[gnu::noinline, gnu::noipa]] void dump_stack(std::uint32_t check,
                                              const char* message) {
  const auto frame = reinterpret_cast<Word>(__builtin_frame_address(0));
  if (!open_dump_file_somehow()) return;
  write_head(message);
  if (stack_dump_fault.is_set)
    write_fault(stack_dump_fault);
  else
    write_stack(frame, check);
  dump_file.close();
}

// ---------------------------------------------------------- frame markers --

zxFrameMarker::zxFrameMarker(std::int32_t value)
    : stack_pos(reinterpret_cast<std::uintptr_t>(this)), data(value) {
  push_frame_marker(this);
}

namespace {

// The place in the list that holds the marker, or null.
zxFrameMarker** find_marker(const zxFrameMarker* marker) {
  zxFrameMarker** at = &frame_markers;
  for (int i = 0; i < k_max_markers && *at != nullptr; ++i, at = &(*at)->next)
    if (*at == marker) return at;
  return nullptr;
}

}  // namespace

void push_frame_marker(zxFrameMarker* marker) {
  if (!ZX_ASSERT(find_marker(marker) == nullptr)) return;
  marker->next = frame_markers;
  frame_markers = marker;
}

void pop_frame_marker(zxFrameMarker* marker) {
  const bool innermost = frame_markers == marker;
  if (zxFrameMarker** place = find_marker(marker)) *place = marker->next;
  ZX_ASSERT(innermost);
}
