// zxstkdmp.h - the stack dump: a text file for the programmers that says
// which program failed how, and walks up the call stack with the raw words
// of every frame.
//
// The file is named after the program, "NAME.dmp", and stands in the
// directory in which the program was started; a disk that cannot take it is
// worked around by trying further drives.  Each failure replaces it.
//
//   @!STKDMP
//
//   -------------------STACK DUMP-------------------
//   @ENV:WIN32
//   @PROG:D:\BIN\VTX2CSV.EXE
//   @VER:1.1
//   @ERR:1002: open: Can't open file 'X' for reading [1002-1002-0/2-0/2/X/]
//   @APP record 17
//   ------ ret @ADDR 00401A2C   BP: 0063FE38
//
//    0: [0063FE10] 0063fe28  00000011  ...
//
// Lines end in CR LF on both targets, the first one in CR CR LF.  A word is
// as wide as a pointer.  Writing the dump never fails the process: each
// pointer is probed before it is followed.
//
// Process-wide state: the frame markers, the fault that is being handled,
// the hooks.
#ifndef ZXSTKDMP_H
#define ZXSTKDMP_H

#include <cstdint>
#include <string_view>

#include "zxtext.h"

class zxStr;

// What an application puts on its stack to say what it is doing at that
// level:
//
//   class CopyingRecord : public zxFrameMarker {
//    public:
//     explicit CopyingRecord(int record) : zxFrameMarker(record) {}
//     zxStr describe() const override { return sfmt("record #", data); }
//   };
//
// Markers are destroyed in the reverse order of their making.
class zxFrameMarker {
 public:
  explicit zxFrameMarker(std::int32_t value = 0);
  virtual ~zxFrameMarker();  // inline: derived classes may have RTTI
  zxFrameMarker(const zxFrameMarker&) = delete;
  zxFrameMarker& operator=(const zxFrameMarker&) = delete;

  // The text of the marker's line in the dump.  It is called while a failure
  // is being handled, so failures inside are dropped.
  virtual zxStr describe() const = 0;

  std::uintptr_t stack_pos;       // where in the stack the marker lies
  std::int32_t data;              // the marker's own value
  zxFrameMarker* next = nullptr;  // the marker below it
};

// The innermost marker; null if there is none.
extern zxFrameMarker* frame_markers;

// What the constructor and the destructor of a marker do.  Pushing one that
// is in the list fails an assertion.  So does popping one that is not the
// innermost; it is taken out all the same, since it is about to be gone.
void push_frame_marker(zxFrameMarker* marker);
void pop_frame_marker(zxFrameMarker* marker);

inline zxFrameMarker::~zxFrameMarker() { pop_frame_marker(this); }

// Writes the dump.  `check` must be 0x1234: it is the word by which the walk
// knows that it starts from the right frame.
void dump_stack(std::uint32_t check, const char* message);

// Adds the name under which the dump is tried first.
void add_stack_dump_name(zxText& out);

// The fault that is being handled, if there is one: the dump then starts
// from its place.
struct StackDumpFault {
  bool is_set;
  std::uintptr_t frame;
  std::uintptr_t instruction;
};
extern StackDumpFault stack_dump_fault;

// What the dump asks of upper floors.  The defaults do without them.
struct StackDumpHooks {
  // The directory of the dump, ending in a backslash.
  const char* (*directory)();

  // Closes the files of the process but for the standard streams, so that a
  // process without a free file handle gets its dump all the same.
  void (*close_files)();

  // Adds a marker's description.
  void (*describe)(const zxFrameMarker& marker, zxText& out);

  // Writes the module manager's lines, each ending in a line feed.
  void (*write_module_lines)(void (*write)(std::string_view text));
};
extern StackDumpHooks stack_dump_hooks;

#endif  // ZXSTKDMP_H
