// tool_run.h - running the built export tool in folders of its own, for the
// process tests.
#ifndef TOOL_RUN_H
#define TOOL_RUN_H

#include <cstdint>
#include <filesystem>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/cases.h"
#include "kit/process.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "obautil/table_bytes.h"

namespace tool_run {

inline constexpr char k_no_programs[] =
    "ZX_BIN_DIR does not name the folder of the built programs";

// The tool, and the same tool without the two seconds that a failure stands,
// whose system calls can be made to fail (fault_main.cpp).
inline constexpr char k_tool[] = "vtx2csv";
inline constexpr char k_quick_tool[] = "vtx2csv_faults";

// True if the programs can be found; otherwise the tests are skipped.
inline bool has_programs() { return !kit::built_program(k_tool).empty(); }

// ---- what a run must make

// The securities of a small table; the second has no name, so it is a free
// slot.
inline std::vector<table_bytes::Record> small_table() {
  return {table_bytes::security(1, "one"), table_bytes::security(2, ""),
          table_bytes::security(3, "\x81\x80")};
}

inline std::string csv_header() {
  std::string line = "seccode";
  for (int code = 37424; code <= 37498; ++code)
    if (code != 37436) line += ", " + std::to_string(code);
  return line + "\r\n\r\n";
}

// The line of table_bytes::security(), its name in UTF-8.
inline std::string csv_line(std::int32_t code, const std::string& name) {
  std::string line = std::to_string(code) + ", , B, " + name;
  for (int i = 0; i < 7; ++i) line += ", ";
  for (int i = 0; i < 52; ++i) line += ", 0";
  for (int i = 0; i < 12; ++i) line += ", 01-01-70";
  return line + "\n";
}

inline std::string small_csv() {
  return csv_header() + csv_line(1, "one") + csv_line(3, "\xD7\x90\xD7\x91");
}

// What the tool says when all went well.
inline std::string told(const std::string& output) {
  return "start converting to " + output + "\r\ndone.\r\n";
}

// ---- what a failed run printed

// A screen with the two numbers of the system replaced by "E", and with the
// line always behind the message.
inline std::string normal_screen(std::string screen) {
  const std::size_t start = screen.rfind('[');
  if (start == screen.npos) return screen;
  const std::size_t first = screen.find('/', start);
  const std::size_t second = screen.find('/', first + 1);
  const std::size_t third = screen.find('/', second + 1);
  if (third == screen.npos) return screen;
  screen.replace(first, third - first, "/E-0/E");
  const std::string_view split = "\r\n           ";
  const std::size_t at = screen.rfind(split, start);
  if (at != screen.npos && at + split.size() == start)
    screen.replace(at, split.size(), " ");
  return screen;
}

// The same screen, put together.
inline std::string failure_screen(const std::string& program,
                                  const std::string& message,
                                  const std::string& line) {
  return "\r\n" + kit::built_program(program) + " 1.01a Fatal Error " +
         message + " " + line + "\r\n";
}

// ---- a place for runs

// A folder with a working directory, one for the table and one for temporary
// files.
class Place {
 public:
  Place() {
    for (const std::string& name : {work(), table(), temp()})
      std::filesystem::create_directory(name);
  }

  std::string work() const { return folder.file("work"); }
  std::string table() const { return folder.file("table"); }
  std::string temp() const { return folder.file("temp"); }
  std::string in_work(const std::string& name) const {
    return (std::filesystem::path(work()) / name).string();
  }
  std::string in_table(const std::string& name) const {
    return (std::filesystem::path(table()) / name).string();
  }

  // Makes a table of these records, each with an entry.
  void make_table(const std::vector<table_bytes::Record>& records) const {
    std::vector<table_bytes::Entry> entries;
    for (std::size_t i = 0; i < records.size(); ++i)
      entries.push_back({"NAME", static_cast<std::int32_t>(i),
                         table_bytes::offset_of(static_cast<int>(i))});
    make_table(entries, records);
  }
  void make_table(const std::vector<table_bytes::Entry>& entries,
                  const std::vector<table_bytes::Record>& records) const {
    kit::write_file(in_table("D4WVTX.IDX"), table_bytes::index_bytes(entries));
    kit::write_file(in_table("D4WVTX.BIN"), table_bytes::data_bytes(records));
  }

  // The names of the temporary files of the tool that are there.
  std::vector<std::string> temporaries() const {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(temp())) {
      const std::string name = entry.path().filename().string();
      if (name.starts_with("tmp") && name.ends_with(".csv"))
        names.push_back(name);
    }
    return names;
  }
  void clear_temporaries() const {
    for (const std::string& name : temporaries())
      std::filesystem::remove(std::filesystem::path(temp()) / name);
  }

  // The environment and the working directory of a run.
  kit::ProcessOptions options() const {
    kit::ProcessOptions options;
    options.directory = work();
    for (const char* name : {"TMPDIR", "TMP", "TEMP"})
      options.variables.emplace_back(name, temp());
    return options;
  }

  kit::ProcessResult run(const std::string& program,
                         const std::vector<std::string>& arguments) const {
    return run(program, arguments, options());
  }
  static kit::ProcessResult run(const std::string& program,
                                const std::vector<std::string>& arguments,
                                const kit::ProcessOptions& options) {
    std::vector<std::string> command = {kit::built_program(program)};
    command.insert(command.end(), arguments.begin(), arguments.end());
    return kit::run_process(command, options);
  }

 private:
  kit::TempDir folder;
};

// A fresh folder on another device than the temporary files; no path if the
// system has none.
class OtherDevice {
 public:
  explicit OtherDevice(const std::string& name) {
    const std::string place = kit::other_device_folder();
    if (place.empty()) return;
    folder = place + "/zxkit-" + name + "-" +
             std::filesystem::path(unique.path()).filename().string();
    std::filesystem::create_directory(folder);
  }
  OtherDevice(const OtherDevice&) = delete;
  OtherDevice& operator=(const OtherDevice&) = delete;
  ~OtherDevice() {
    std::error_code ignored;
    if (!folder.empty()) std::filesystem::remove_all(folder, ignored);
  }

  bool exists() const { return !folder.empty(); }
  const std::string& path() const { return folder; }
  std::string file(const std::string& name) const {
    return folder + "/" + name;
  }

 private:
  kit::TempDir unique;
  std::string folder;
};

}  // namespace tool_run

#endif  // TOOL_RUN_H
