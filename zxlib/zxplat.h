// zxplat.h - the platform line: all that the library asks of the operating
// system.
//
// No other header or source of the library names a system call, a system
// header or a system macro; the build picks the sources that carry this out
// for its target.  The terms are the library's own:
//
//   names       byte strings in Win32 form: the backslash separates, the
//               forward slash is accepted, "C:" is understood.  At most
//               k_max_name bytes; a name with a NUL byte or one of *?"<>|
//               inside is refused (k_err_bad_name).  Natively there is one
//               drive, "C:" or nothing; a name that is not there as spelled is
//               looked for without regard to ASCII case, the exact spelling
//               first.
//   descriptors small integers, 0 to 2 the standard streams.  All byte
//               streams are binary.
//   failures    a result that says so, and then the system's number in
//               last_error().  A call that succeeds leaves last_error()
//               alone, so the number of the last failure stays readable.
//
// Calls that fail in real life go through the tables `files` and `process`,
// which a test may replace entry by entry; everything else is a plain
// function.  Nothing here allocates, keeps a pointer that it was given, or
// calls back into the library.
#ifndef ZXPLAT_H
#define ZXPLAT_H

#include <cstddef>
#include <cstdint>
#include <ctime>
#include <span>
#include <string_view>

namespace zxplat {

// The longest name that the platform takes, in bytes.
inline constexpr std::size_t k_max_name = 4095;

// Error numbers that callers or tests tell apart.  They are the Windows
// numbers on both targets.
inline constexpr int k_err_none = 0;
inline constexpr int k_err_not_found = 2;       // the last component is missing
inline constexpr int k_err_path_not_found = 3;  // a folder ahead of it is
inline constexpr int k_err_too_many_open = 4;
inline constexpr int k_err_denied = 5;
inline constexpr int k_err_bad_handle = 6;
inline constexpr int k_err_no_memory = 8;
inline constexpr int k_err_other_device = 17;
inline constexpr int k_err_write_protected = 19;
inline constexpr int k_err_io = 31;
inline constexpr int k_err_sharing = 32;
inline constexpr int k_err_lock = 33;
inline constexpr int k_err_exists_on_create = 80;
inline constexpr int k_err_bad_parameter = 87;
inline constexpr int k_err_broken_pipe = 109;
inline constexpr int k_err_disk_full = 112;
inline constexpr int k_err_bad_name = 123;
inline constexpr int k_err_not_locked = 158;
inline constexpr int k_err_exists = 183;

// The number of the last call of this module that failed, or what
// set_last_error() stored behind it.
int last_error();
void set_last_error(int number);

// ---------------------------------------------------------------- files --

using Fd = int;
inline constexpr Fd k_no_fd = -1;
inline constexpr Fd k_stdin_fd = 0;
inline constexpr Fd k_stdout_fd = 1;
inline constexpr Fd k_stderr_fd = 2;

enum class OpenMode {
  read,            // existing file, reading
  create,          // writing; made, or cut to nothing
  create_new,      // writing; refused (80) if the name is taken, even by a link
  create_private,  // as create_new, for the owner's eyes alone; on Windows
                   // for those that the folder is for
  read_write,      // existing file, both; refused without the right to write
  append,          // writing, always at the end; made if it is missing.  The
                   // position after opening is the end.
  read_append,     // as append, and reading
};

enum class Whence { start, current, end };

// What a descriptor does to the bytes that pass it: nothing, or what the
// system does to text.  Only Windows does anything: a line feed becomes CR
// LF on the way out, and the other way round.
enum class StreamMode { binary, text };

enum class RenameResult {
  done,
  other_device,  // the two names lie on different devices (17)
  failed,        // for the reason in last_error()
};

// The room on a disk, as the system counts it.
struct DiskSpace {
  std::uint64_t free_clusters;  // those that the caller may use
  std::uint64_t sectors_per_cluster;
  std::uint64_t bytes_per_sector;
};

// The calls on files that a test can make fail.
struct FileCalls {
  // Opens `name`; k_no_fd on failure.  A folder fails with 5.  The name
  // "nul" in any case is the null device.  Other processes are not locked
  // out, and child processes do not inherit the descriptor.
  Fd (*open)(std::string_view name, OpenMode mode);

  // Reads up to `size` bytes; the count, 0 at the end of the file, -1 on
  // failure.  A short count is no failure.
  std::int64_t (*read)(Fd fd, void* buffer, std::size_t size);

  // Writes up to `size` bytes; the count, which may be short, or -1.
  std::int64_t (*write)(Fd fd, const void* buffer, std::size_t size);

  // Moves the position; the new position from the start, or -1.
  std::int64_t (*seek)(Fd fd, std::int64_t offset, Whence whence);

  // Forces what was written down to the device.
  bool (*flush)(Fd fd);

  // The file's size in bytes, or -1.
  std::int64_t (*size)(Fd fd);

  // Cuts the file, or widens it by zeros; the position stays, be it behind
  // the new end.  A descriptor that is not open for writing fails with 5, a
  // negative size with 87.
  bool (*set_size)(Fd fd, std::int64_t size);

  // Locks and unlocks `size` bytes, at least one, which need not exist.
  // Nobody waits: bytes that another process, or another descriptor of this
  // one, has locked fail with 33.  What is unlocked must be exactly what was
  // locked.  Closing the descriptor unlocks all.  Natively a lock concerns
  // only those who ask for one, and needs a descriptor that is open for
  // writing (otherwise 5); Windows keeps others from reading and writing.
  bool (*lock)(Fd fd, std::int64_t start, std::int64_t size);
  bool (*unlock)(Fd fd, std::int64_t start, std::int64_t size);

  // Switches a descriptor over; see set_binary().
  bool (*set_mode)(Fd fd, StreamMode mode);

  // Gives the descriptor back.  It is gone whatever the result is; false
  // means that data may not have reached the file.
  bool (*close)(Fd fd);

  // Renames; an existing `to` is never replaced (183).
  RenameResult (*rename)(std::string_view from, std::string_view to);

  // Deletes a file.  A folder fails with 5, and so do a device and a file
  // without any write permission.
  bool (*remove)(std::string_view name);

  // Makes a folder; a name that is taken fails with 183.
  bool (*make_folder)(std::string_view name);

  // Deletes a folder; one that is not empty fails with 145.
  bool (*remove_folder)(std::string_view name);

  // Makes the number `to` stand for what `from` stands for, in place of what
  // it stood for before; `from` stays.
  bool (*bind)(Fd from, Fd to);

  // The room on the disk of a drive, 0 for the current one; the one drive
  // that there is natively has the disk of the working directory.
  bool (*disk_space)(char letter, DiskSpace& space);
};

// The system's own calls, and the table in force, which starts as a copy of
// them.
extern const FileCalls system_files;
extern FileCalls files;

// Writes all of a text by files.write; false if the system refused bytes.
bool write_all(Fd fd, std::string_view text);

// True for the name of the null device, "nul" in any case.
bool is_null_device(std::string_view name);

// What a name stands for.  Links are followed.
enum class NameKind {
  missing,    // nothing, or not to be reached; the reason in last_error()
  file,       // a regular file
  directory,  // a folder
  device,     // a character device; Windows shows it as a file
  other,      // a pipe, a socket or the like
};
NameKind kind_of(std::string_view name);

// What the system knows of a name.  Links are followed.
struct FileStatus {
  NameKind kind;
  std::int64_t size;      // in bytes; 0 for what is no regular file
  std::int64_t modified;  // seconds since 1970-01-01 00:00 UTC
  bool is_executable;     // for its owner; the runtime's guess on Windows
};
FileStatus status_of(std::string_view name);

// True if the name is that of a whole volume: a drive or, on Windows, a
// shared folder of another computer.
bool is_volume(std::string_view name);

// True if something has this name, be it a link that leads nowhere.  False
// with 2 in last_error() says that the name is free; with any other number,
// that it cannot be told.
bool name_taken(std::string_view name);

// True if both names lead to one existing file.
bool same_file(std::string_view a, std::string_view b);

// False if it is known that a rename of the file `from` to the name `to`
// would have to cross devices; true otherwise, also when it cannot be told.
bool on_one_device(std::string_view from, std::string_view to);

// Gives a file the write permission without which it cannot be deleted.
bool make_writable(std::string_view name);

// Gives the file `to` the permissions of `from`.
bool copy_permissions(std::string_view from, std::string_view to);

// Gives the file `to` the modification time of `from`, as its access time as
// well.
bool copy_time(std::string_view from, std::string_view to);

// The working directory and the system's directory for temporary files, in
// Win32 form.  Each returns the length of the text and stores it with a NUL
// if it fits `out`, NUL included; a result of out.size() or more asks for a
// larger buffer (nothing was stored), 0 means failure.  The temporary
// directory is, natively, TMPDIR, TMP or TEMP of the environment, else
// "\tmp\"; it ends in a backslash.
std::size_t current_directory(std::span<char> out);
std::size_t temp_directory(std::span<char> out);

// Changes the working directory.
bool set_current_directory(std::string_view name);

// An entry of a folder.
struct FolderEntry {
  std::string_view name;  // lasts until the next entry is asked for
  bool is_folder;         // or a link to one
  bool is_link;           // it leads somewhere else
};

// Reads a folder's entries, in the system's order and without "." and "..".
// Entries whose names cannot be names here, such as those that hold a
// wildcard or a backslash, are left out.
//
//   FolderReader reader("data");
//   for (FolderEntry entry; reader.next(entry);) ...
class FolderReader {
 public:
  // A folder that cannot be read has no entries; the reason is in
  // last_error().  An empty name is the working directory.
  explicit FolderReader(std::string_view folder);
  ~FolderReader();
  FolderReader(const FolderReader&) = delete;
  FolderReader& operator=(const FolderReader&) = delete;

  // The next entry; false at the end.
  bool next(FolderEntry& entry);

 private:
  // The system's handle, and what it has delivered ahead.
  std::intptr_t handle;
  std::size_t at = 0;
  std::size_t size = 0;
  alignas(8) char room[8192];
};

// -------------------------------------------------------------- process --

// The style of a message box with one button "OK" and the sign of an error,
// ahead of every other window.
inline constexpr std::uint32_t k_error_box = 0x1010;

// The calls on the process and its clocks that a test can replace.
struct ProcessCalls {
  // Ends the process through its exit handlers; comes back only in tests.
  void (*exit)(int code);

  // The same without exit handlers.
  void (*exit_at_once)(int code);

  // Seconds since 1970-01-01 00:00 UTC.
  std::int64_t (*clock)();

  // Milliseconds since some moment, modulo 2^32.
  std::uint32_t (*ticks)();

  // Lets the given time pass.
  void (*sleep)(std::uint32_t milliseconds);

  // Shows a message box and waits for the answer; `style` is a number of
  // Windows.  If the environment variable ZX_BOX_OUT names a file or is "-"
  // (standard error), the box is not shown: the caption, the style in
  // hexadecimal and the text are added there, each with a line feed behind
  // it.  A system without boxes writes them to standard error.
  void (*message_box)(const char* text, const char* caption,
                      std::uint32_t style);

  // Says what a process has to say that cannot even fail.  It goes where
  // message_box() goes, as the text alone; the system's own box ends the
  // process.
  void (*last_words)(const char* text);

  // Stops in the debugger if one is attached.
  void (*debug_break)();

  // Hands a text to the debugger.  If the environment variable ZX_DEBUG_OUT
  // names a file or is "-" (standard error), it is added there as well; a
  // system without debugger output has no other place for it.
  void (*debug_output)(const char* text);

  // True on Windows 95 (platform 1, version 4.0), whose screens lay out
  // percent signs in Hebrew text in a way of their own.
  bool (*is_windows_95)();
};

extern const ProcessCalls system_process;
extern ProcessCalls process;

// Prepares the process, once, ahead of everything else: a write to a closed
// pipe is an error and not a signal, and each of the descriptors 0 to 2
// that the process was started without is bound to the null device, so that
// no data file can come to stand under its number.
void prepare_process();

// The value of an environment variable, which lasts until the environment
// changes; null if there is none of that name.
const char* environment_variable(const char* name);

// Switches a descriptor to bytes without translation; false if that fails.
bool set_binary(Fd fd);

// True if there is anything behind the descriptor.
bool has_stream(Fd fd);

// True if a person sits at the other end.
bool is_terminal(Fd fd);

// ----------------------------------------------------------- local time --

// Moments are seconds since 1970-01-01 00:00 UTC, as process.clock() counts
// them.  The zone is that of the environment variable TZ, as in "EST5EDT",
// else the system's.  A program that changes it as it runs may see the new
// zone's offset with the daylight saving of the old one.

// The last moment that has fields: the end of the year 3000, UTC.
inline constexpr std::int64_t k_last_moment = 32'535'215'999;

// What the local clock shows at a moment, daylight saving included.  False
// (87), and `fields` unchanged, outside of 0 to k_last_moment.  A TZ that
// names daylight saving without its rules is at the system's mercy: one takes
// New York's, and its offset as well from the end of 2037 on.
bool local_time(std::int64_t moment, std::tm& fields);

// The seconds that a clock without daylight saving is behind UTC in the
// standard time of the present; negative east of it.
std::int32_t standard_zone_offset();

// --------------------------------------------------------------- faults --

// A hardware fault.  The sub-code tells apart what the signal has in common;
// for arithmetic 129 is an invalid operation, 131 a division by zero, 132 an
// overflow, 133 an underflow, 134 a lost digit of floating-point numbers.
// The two addresses are those of the place of the fault, 0 if unknown.
struct Fault {
  int signal;  // 4 illegal instruction, 8 arithmetic, 11 bad address
  int sub_code;
  std::uintptr_t frame;
  std::uintptr_t instruction;
};

// Has faults reported to `handler`, which runs on a stack of its own, but for
// arithmetic: there it runs on the stack of the place that failed.  If it
// comes back from a fault, the system's own action takes place: the end of
// the process.  A signal that the process sent itself is over then.
// The system's boxes for failing devices are switched off.
using FaultHandler = void (*)(const Fault& fault);
void catch_faults(FaultHandler handler);

// --------------------------------------------------------------- memory --

// Copies memory of this process; false if not all of it can be read.  The
// stack's guard page counts as such and stays intact.
bool read_memory(std::uintptr_t from, void* out, std::size_t size);

}  // namespace zxplat

#endif  // ZXPLAT_H
