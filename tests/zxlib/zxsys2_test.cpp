// zxsys2_test.cpp - operations on whole files and folders by name: the two
// folders of the process, unique names, reading and writing, comparing,
// deleting, copying and moving, making folders, disks and the environment in
// each of their outcomes.
// Tests zxlib/zxsys2.h, zxsys2.cpp and zxsys2_data.cpp.
#include "zxsys2.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "kit/faults.h"
#include "kit/process.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "kit/ticks.h"
#include "zxmainf.h"
#include "zxplat.h"
#include "zxsfmt.h"

namespace {

namespace fs = std::filesystem;

using kit::Call;
using kit::expect_assertion_at;
using kit::Faults;
using kit::is_read_only;
using kit::line_of;
using kit::make_read_only;
using kit::names_in;
using kit::read_file;
using kit::TempDir;
using kit::Ticks;
using kit::WorkingIn;
using kit::write_file;
using Names = std::vector<std::string>;

using kit::text_of;

std::string quoted(const std::string& text) { return "'" + text + "'"; }

// Names are handed to the statement as plain text: strings that it shares
// with the test would count as lost when it is jumped out of.
void expect_failure(const std::function<void()>& statement, int number,
                    const std::string& message, const std::string& text) {
  EXPECT_FAILURE(statement(), std::to_string(number) + ": " + message,
                 line_of(number, text));
}

// Variables of the environment that name the temporary folder; they, and
// the library's memory of them, are as before at the end.
class TempVariables {
 public:
  explicit TempVariables(const std::string& value) {
    for (const char* name : k_names) {
      const char* old = std::getenv(name);
      before.push_back(old != nullptr ? old : "");
      kit::set_variable(name, value.c_str());
    }
  }
  TempVariables(const TempVariables&) = delete;
  TempVariables& operator=(const TempVariables&) = delete;
  ~TempVariables() {
    for (std::size_t i = 0; i < before.size(); ++i) {
      kit::set_variable(k_names[i],
                        before[i].empty() ? nullptr : before[i].c_str());
    }
    clear_temp_path();
  }

 private:
  static constexpr const char* k_names[] = {"TMPDIR", "TMP", "TEMP"};
  Names before;
};

// ---- the two folders of the process

std::string in_library_form(std::string path) {
  std::replace(path.begin(), path.end(), '/', '\\');
  return path;
}

TEST(zxsys2, the_working_directory_has_no_backslash_at_its_end) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  EXPECT_EQ(text_of(get_cwd()), in_library_form(fs::current_path().string()));
}

TEST(zxsys2, the_working_directory_at_the_root_keeps_its_backslash) {
  const WorkingIn there(fs::current_path().root_path().string());
  EXPECT_EQ(text_of(get_cwd()),
            in_library_form(fs::current_path().root_path().string()));
  EXPECT_EQ(text_of(get_cwd()).back(), '\\');
}

TEST(zxsys2, a_working_directory_may_have_a_long_name) {
  if (kit::on_windows()) GTEST_SKIP() << "names of folders are short here";
  const TempDir folder;
  fs::path deep = folder.path();
  for (int i = 0; i < 6; ++i) deep /= std::string(200, 'd');
  fs::create_directories(deep);
  const WorkingIn there(deep.string());
  EXPECT_EQ(text_of(get_cwd()), in_library_form(deep.string()));
}

TEST(zxsys2, a_working_directory_that_is_gone_fails_an_assertion) {
  if (kit::on_windows()) GTEST_SKIP() << "it cannot be deleted here";
  const TempDir folder;
  const std::string gone = folder.file("gone");
  fs::create_directory(gone);
  const WorkingIn there(gone);
  fs::remove(gone);
  expect_assertion_at([] { get_cwd(); }, "zxsys2:398");
  kit::with_failures_dropped([] { EXPECT_EQ(text_of(get_cwd()), ""); });
}

TEST(zxsys2, the_temporary_directory_is_the_systems_with_a_backslash) {
  const TempDir folder;
  for (const char* ending : {"", "/", "\\"}) {
    const TempVariables variables(folder.path() + ending);
    clear_temp_path();
    EXPECT_EQ(in_library_form(text_of(temp_path())),
              in_library_form(folder.path()) + "\\");
    EXPECT_EQ(text_of(temp_path()).back(), '\\');
  }
}

TEST(zxsys2, the_temporary_directory_is_asked_for_once) {
  const TempDir first;
  const TempDir second;
  const TempVariables outer(first.path());
  clear_temp_path();
  const std::string asked = text_of(temp_path());
  const TempVariables inner(second.path());
  EXPECT_EQ(text_of(temp_path()), asked);
  clear_temp_path();
  EXPECT_EQ(in_library_form(text_of(temp_path())),
            in_library_form(second.path()) + "\\");
}

TEST(zxsys2, a_temporary_directory_may_have_a_long_name) {
  if (kit::on_windows()) GTEST_SKIP() << "names of folders are short here";
  const std::string value = "/" + std::string(3000, 't');
  const TempVariables variables(value);
  clear_temp_path();
  EXPECT_EQ(text_of(temp_path()), "\\" + std::string(3000, 't') + "\\");
}

// ---- unique names

// The number in a name "...tmpN.tmp" that `uniqfile` makes.
std::uint32_t number_in(const zxStr& name) {
  const std::string text = text_of(file_part(name));
  EXPECT_EQ(text.substr(0, 3), "tmp");
  return static_cast<std::uint32_t>(std::stoul(text.substr(3)));
}

// The number of names that were tried so far, modulo 99991.
std::uint32_t names_tried(const TempDir& folder) {
  const Ticks zero(0);
  return number_in(uniqfile(folder.path().c_str(), nullptr));
}

std::string unique_name(const TempDir& folder, std::uint32_t number,
                        const std::string& ending) {
  return folder.path() + "\\tmp" + std::to_string(number) + ending;
}

ZX_CASE(zxsys2_first_names) {
  init_zxlib_args(argc, argv);
  for (const std::uint32_t ticks : {0U, 1U, 1000U}) {
    const Ticks fake(ticks);
    oprint("# ", uniqfile("", nullptr));
  }
  const Ticks last(0xFFFFFFFFU);
  oprint("#", uniqfile("", nullptr));
  return 0;
}

TEST(zxsys2, the_first_names_of_a_process_worked_out_by_hand) {
  const TempDir folder;
  kit::ProcessOptions options;
  options.directory = folder.path();
  // 0 + 1; 9876553 + 2 = 98 * 99991 + 77437; 1000 * 9876553, which is
  // 1286618408 behind two turns of 2^32, + 3 = 12867 * 99991 + 34214;
  // 2^32 - 9876553 + 4 = 4285090747 = 42854 * 99991 + 76433.
  EXPECT_EQ(kit::run_case("zxsys2_first_names", {}, options).out,
            "tmp1.tmp tmp77437.tmp tmp34214.tmp tmp76433.tmp");
}

TEST(zxsys2, the_number_comes_from_the_clock_and_a_counter_in_32_bits) {
  const TempDir folder;
  std::uint64_t tried = names_tried(folder);
  for (const std::uint32_t ticks : {0U, 1U, 434U, 435U, 123'456'789U,
                                    0x7FFFFFFFU, 0x80000000U, 0xFFFFFFFFU}) {
    const Ticks fake(ticks);
    ++tried;
    const std::uint64_t sum = std::uint64_t{ticks} * 9'876'553 + tried;
    const std::uint64_t number = (sum & 0xFFFFFFFF) % 99'991;
    EXPECT_EQ(number_in(uniqfile(folder.path().c_str(), nullptr)), number)
        << ticks;
  }
}

TEST(zxsys2, a_unique_name_is_that_of_no_file_and_none_is_made) {
  const TempDir folder;
  const zxStr a = uniqfile(folder.path().c_str(), nullptr);
  const zxStr b = uniqfile(folder.path().c_str(), nullptr);
  EXPECT_FALSE(a == b);
  EXPECT_TRUE(names_in(folder.path()).empty());
}

TEST(zxsys2, the_extension_decides_the_ending) {
  const TempDir folder;
  const struct {
    const char* extension;
    const char* ending;
  } rows[] = {{nullptr, ".tmp"}, {"", ""},      {"csv", ".csv"},
              {"a.b", ".a.b"},   {".x", "..x"}, {"x.", ".x"}};
  std::uint32_t tried = names_tried(folder);
  const Ticks zero(0);
  for (const auto& row : rows) {
    ++tried;
    EXPECT_EQ(text_of(uniqfile(folder.path().c_str(), row.extension)),
              unique_name(folder, tried, row.ending));
  }
}

TEST(zxsys2, the_folder_of_a_unique_name_gets_its_separator) {
  const TempDir folder;
  std::uint32_t tried = names_tried(folder);
  const Ticks zero(0);
  for (const char* separator : {"", "\\", "/"}) {
    const zxStr name = uniqfile((folder.path() + separator).c_str(), nullptr);
    EXPECT_EQ(text_of(name), unique_name(folder, ++tried, ".tmp"));
  }
  const WorkingIn there(folder.path());
  EXPECT_EQ(text_of(uniqfile("", nullptr)),
            "tmp" + std::to_string(++tried) + ".tmp");
}

TEST(zxsys2, taken_names_are_passed_over) {
  const TempDir folder;
  const std::uint32_t tried = names_tried(folder);
  for (std::uint32_t i = 1; i <= 29; ++i)
    write_file(folder.file("tmp" + std::to_string(tried + i) + ".tmp"), "");
  const Ticks zero(0);
  EXPECT_EQ(text_of(uniqfile(folder.path().c_str(), nullptr)),
            unique_name(folder, tried + 30, ".tmp"));
}

TEST(zxsys2, a_folder_takes_a_name_as_well) {
  const TempDir folder;
  const std::uint32_t tried = names_tried(folder);
  fs::create_directory(folder.file("tmp" + std::to_string(tried + 1)));
  const Ticks zero(0);
  EXPECT_EQ(text_of(uniqfile(folder.path().c_str(), "")),
            unique_name(folder, tried + 2, ""));
}

TEST(zxsys2, thirty_taken_names_are_fatal) {
  const TempDir folder;
  std::uint32_t tried = names_tried(folder);
  for (std::uint32_t i = 1; i <= 90; ++i)
    write_file(folder.file("tmp" + std::to_string(tried + i) + ".tmp"), "");
  const Ticks zero(0);
  tried += 30;
  const std::string last = unique_name(folder, tried, ".tmp");
  expect_failure([&] { uniqfile(folder.path().c_str(), nullptr); }, 1037,
                 "uniqfile: failed to find on " + quoted(last), last);
  tried += 30;
  kit::with_failures_dropped([&] {
    EXPECT_EQ(text_of(uniqfile(folder.path().c_str(), nullptr)),
              unique_name(folder, tried, ".tmp"));
  });
}

TEST(zxsys2, in_a_missing_folder_no_name_can_be_judged) {
  const TempDir folder;
  const std::uint32_t tried = names_tried(folder);
  const Ticks zero(0);
  const std::string missing = folder.path() + "\\none";
  const std::string last =
      missing + "\\tmp" + std::to_string(tried + 30) + ".csv";
  expect_failure([&] { uniqfile(missing.c_str(), "csv"); }, 1037,
                 "uniqfile: failed to find on " + quoted(last), last);
}

TEST(zxsys2, a_unique_temporary_name_is_in_the_temporary_directory) {
  const TempDir folder;
  const std::uint32_t tried = names_tried(folder);
  const TempVariables variables(folder.path());
  clear_temp_path();
  const Ticks zero(0);
  EXPECT_EQ(in_library_form(text_of(unique_temp_name("csv"))),
            in_library_form(unique_name(folder, tried + 1, ".csv")));
}

// ---- temporary files

// A folder that is the temporary directory, where time stands still.
class TempFolder {
 public:
  TempFolder() { clear_temp_path(); }

  // The name of the n-th temporary file from now on.
  std::string name(std::uint32_t n) const {
    return text_of(temp_path()) + "tmp" + std::to_string(tried + n) + ".csv";
  }
  std::string path() const { return folder.path(); }

  // The same name without the folder.
  std::string file(std::uint32_t n) const {
    return "tmp" + std::to_string(tried + n) + ".csv";
  }

 private:
  const TempDir folder;
  const std::uint32_t tried = names_tried(folder);
  const TempVariables variables{folder.path()};
  const Ticks zero{0};
};

TEST(zxsys2, a_temporary_file_is_made_and_open) {
  const TempFolder temp;
  zxBFile file;
  EXPECT_EQ(text_of(create_temp_file(file, "csv")), temp.name(1));
  ASSERT_TRUE(file.is_open());
  EXPECT_EQ(text_of(file.name), temp.name(1));
  file.puts("text");
  file.close(no_detail);
  EXPECT_EQ(names_in(temp.path()), (Names{temp.file(1)}));
}

TEST(zxsys2, a_temporary_file_takes_no_name_that_is_taken_meanwhile) {
  const TempFolder temp;
  zxBFile file;
  Faults faults;
  faults.fail_nth(Call::open, 1, zxplat::k_err_exists_on_create);
  EXPECT_EQ(text_of(create_temp_file(file, "csv")), temp.name(2));
  EXPECT_TRUE(file.is_open());
  EXPECT_EQ(names_in(temp.path()), (Names{temp.file(2)}));
}

TEST(zxsys2, a_temporary_file_never_goes_through_a_link) {
  const TempFolder temp;
  const TempDir elsewhere;
  if (!kit::make_link(elsewhere.file("victim"),
                      temp.path() + "/" + temp.file(1)))
    GTEST_SKIP() << "a program cannot make links here";
  zxBFile file;
  EXPECT_EQ(text_of(create_temp_file(file, "csv")), temp.name(2));
  EXPECT_TRUE(names_in(elsewhere.path()).empty());
}

TEST(zxsys2, a_temporary_file_that_cannot_be_made_is_fatal) {
  const TempFolder temp;
  zxBFile file;
  Faults faults;
  faults.fail_all(Call::open, zxplat::k_err_disk_full);
  expect_failure(
      [&] { create_temp_file(file, "csv"); }, 1004,
      "create: Can't open file " + quoted(temp.name(1)) + " for writing",
      temp.name(1));
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(text_of(create_temp_file(file, "csv")), temp.name(2)); });
  EXPECT_FALSE(file.is_open());
  EXPECT_EQ(faults.count(Call::open), 2);
}

TEST(zxsys2, thirty_names_that_others_take_meanwhile_are_fatal) {
  const TempFolder temp;
  zxBFile file;
  Faults faults;
  faults.fail_all(Call::open, zxplat::k_err_exists_on_create);
  expect_failure(
      [&] { create_temp_file(file, "csv"); }, 1004,
      "create: Can't open file " + quoted(temp.name(30)) + " for writing",
      temp.name(30));
  EXPECT_EQ(faults.count(Call::open), 30);
}

// A folder with two files.
class Files {
 public:
  Files() {
    write_file(from, k_from_bytes);
    write_file(to, k_to_bytes);
  }

  static constexpr char k_from_bytes[] = "the new text";
  static constexpr char k_to_bytes[] = "the old text, which is longer";

  TempDir folder;
  const std::string from = folder.path() + k_separator + "from";
  const std::string to = folder.path() + k_separator + "to";
  const std::string missing = folder.path() + k_separator + "none";
  const std::string in_missing_folder = missing + k_separator + "file";

 private:
  // One that the standard library takes on both targets.
  static constexpr char k_separator = '/';
};

void set_time(const std::string& path, int hours_ago) {
  fs::last_write_time(
      path, fs::file_time_type::clock::now() - std::chrono::hours(hours_ago));
}

// ---- writing whole files

// Bytes that differ from place to place.
std::string some_bytes(std::size_t size) {
  std::string bytes(size, '\0');
  for (std::size_t i = 0; i < size; ++i)
    bytes[i] = static_cast<char>((i + i / 255) & 0xFF);
  return bytes;
}

zxStr to_text(const std::string& bytes) {
  return zxStr(bytes.data(), static_cast<std::int32_t>(bytes.size()));
}

// Lines as the library takes them.
struct Lines : zxQVA<zxStr> {
  explicit Lines(const Names& lines) {
    for (const std::string& line : lines) append(to_text(line));
  }
};

TEST(zxsys2, a_text_replaces_a_file_or_is_added_to_it) {
  const Files files;
  const std::string bytes("a\r\n\0\x1a\xff\n", 7);
  EXPECT_TRUE(str2file(files.to.c_str(), to_text(bytes)));
  EXPECT_EQ(read_file(files.to), bytes);
  EXPECT_TRUE(str2file(files.to.c_str(), "more", true));
  EXPECT_EQ(read_file(files.to), bytes + "more");
  EXPECT_TRUE(str2file(files.to.c_str(), "", true));
  EXPECT_EQ(read_file(files.to), bytes + "more");
  EXPECT_TRUE(str2file(files.to.c_str(), ""));
  EXPECT_EQ(read_file(files.to), "");
  EXPECT_TRUE(str2file(files.missing.c_str(), "new", true));
  EXPECT_EQ(read_file(files.missing), "new");
  str2file_or_die(files.missing.c_str(), "newer");
  str2file_or_die(files.missing.c_str(), "st", true);
  EXPECT_EQ(read_file(files.missing), "newerst");
}

TEST(zxsys2, a_text_of_any_size_is_written_whole) {
  const Files files;
  for (const std::size_t size : {65'535, 65'536, 65'537, 1'000'000}) {
    const std::string bytes = some_bytes(size);
    EXPECT_TRUE(str2file(files.to.c_str(), to_text(bytes)));
    EXPECT_TRUE(read_file(files.to) == bytes) << size;
    EXPECT_TRUE(str2file(files.to.c_str(), to_text(bytes), true));
    EXPECT_TRUE(read_file(files.to) == bytes + bytes) << size;
  }
}

TEST(zxsys2, lines_get_line_ends_unless_they_begin_with_a_line_feed) {
  const Files files;
  const struct {
    Names lines;
    const char* expected;
  } rows[] = {
      {{}, ""},
      {{""}, "\r\n"},
      {{"a"}, "a\r\n"},
      {{"a", "", "b"}, "a\r\n\r\nb\r\n"},
      {{"\n"}, "\n"},
      {{"\na", "b"}, "\nab\r\n"},
      {{"a\n", "\r\n"}, "a\n\r\n\r\n\r\n"},
      {{" \n"}, " \n\r\n"},
  };
  for (const auto& row : rows) {
    EXPECT_TRUE(lines2file(files.to.c_str(), Lines(row.lines)));
    EXPECT_EQ(read_file(files.to), row.expected);
  }
}

TEST(zxsys2, lines_are_added_to_a_file) {
  const Files files;
  EXPECT_TRUE(lines2file(files.missing.c_str(), Lines({"a"}), true));
  EXPECT_TRUE(lines2file(files.missing.c_str(), Lines({"b", "c"}), true));
  EXPECT_EQ(read_file(files.missing), "a\r\nb\r\nc\r\n");
  lines2file_or_die(files.missing.c_str(), Lines({"d"}), true);
  EXPECT_EQ(read_file(files.missing), "a\r\nb\r\nc\r\nd\r\n");
  lines2file_or_die(files.missing.c_str(), Lines({"e"}));
  EXPECT_EQ(read_file(files.missing), "e\r\n");
}

// The two ways to write a file: false on failure, and with an assertion.
struct Writer {
  const char* label;
  std::function<bool(const char* name, bool append)> attempt;
  std::function<void(const char* name, bool append)> or_die;
};

// They write some 200000 bytes, in four calls of the system.
std::vector<Writer> writers() {
  static const zxStr text = to_text(std::string(200'000, 'x'));
  static const Lines lines(Names(2000, std::string(98, 'x')));
  return {{"str2file",
           [](const char* name, bool append) {
             return str2file(name, text, append);
           },
           [](const char* name, bool append) {
             str2file_or_die(name, text, append);
           }},
          {"lines2file",
           [](const char* name, bool append) {
             return lines2file(name, lines, append);
           },
           [](const char* name, bool append) {
             lines2file_or_die(name, lines, append);
           }}};
}

void expect_no_writing(const std::string& name) {
  for (const Writer& writer : writers()) {
    for (const bool append : {false, true}) {
      SCOPED_TRACE(testing::Message()
                   << writer.label << ' ' << name << ' ' << append);
      EXPECT_FALSE(writer.attempt(name.c_str(), append));
      EXPECT_ASSERTION(writer.or_die(name.c_str(), append), "zxsys2_data");
      kit::with_failures_dropped([&] { writer.or_die(name.c_str(), append); });
    }
  }
}

TEST(zxsys2, what_cannot_be_opened_is_not_written) {
  const Files files;
  make_read_only(files.to);
  for (const std::string& name :
       {files.to, files.folder.path(), files.in_missing_folder, std::string()})
    expect_no_writing(name);
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_full_device_is_told_by_those_who_write_to_it) {
  const std::string device = kit::full_device();
  if (device.empty()) GTEST_SKIP() << "no device that is full";
  expect_no_writing(device);
  EXPECT_FALSE(str2file(device.c_str(), "x"));  // at the close alone
  EXPECT_TRUE(str2file(device.c_str(), ""));
}

TEST(zxsys2, each_failed_call_of_writing_is_told_and_the_file_closed) {
  const Files files;
  const struct {
    Call call;
    int n;
  } rows[] = {{Call::open, 1},  {Call::write, 1}, {Call::write, 2},
              {Call::write, 3}, {Call::write, 4}, {Call::close, 1}};
  for (const Writer& writer : writers()) {
    for (const auto& row : rows) {
      SCOPED_TRACE(testing::Message()
                   << writer.label << ' ' << kit::name_of(row.call) << row.n);
      Faults faults;
      faults.fail_nth(row.call, row.n, zxplat::k_err_disk_full);
      EXPECT_FALSE(writer.attempt(files.to.c_str(), false));
      EXPECT_EQ(faults.count(Call::close), row.call == Call::open ? 0 : 1);
      EXPECT_TRUE(writer.attempt(files.to.c_str(), false));
      EXPECT_EQ(faults.count(Call::write), row.call == Call::open ? 4
                                           : row.call == Call::close
                                               ? 8
                                               : row.n + 4);
    }
  }
}

// ---- reading whole files

std::string text_in(const std::string& name) {
  zxStr text = "before";
  EXPECT_TRUE(file2str(name.c_str(), text)) << name;
  return text_of(text);
}

TEST(zxsys2, a_file_is_read_whole) {
  const Files files;
  const std::string odd("a\r\n\0\x1a\xff\n", 7);
  write_file(files.to, odd);
  EXPECT_EQ(text_in(files.to), odd);
  for (const std::size_t size : {0, 1, 65'534, 65'535, 65'536, 65'537, 131'071,
                                 131'072, 131'073, 1'000'000}) {
    const std::string bytes = some_bytes(size);
    write_file(files.to, bytes);
    EXPECT_TRUE(text_in(files.to) == bytes) << size;
  }
}

TEST(zxsys2, what_cannot_be_opened_leaves_an_empty_text) {
  const Files files;
  for (const std::string& name : {files.missing, files.in_missing_folder,
                                  files.folder.path(), std::string()}) {
    zxStr text = "before";
    EXPECT_FALSE(file2str(name.c_str(), text)) << name;
    EXPECT_TRUE(text.is_empty()) << name;
  }
}

TEST(zxsys2, the_name_may_be_the_text_that_is_read_into) {
  const Files files;
  zxStr text = files.from.c_str();
  EXPECT_TRUE(file2str(text, text));
  EXPECT_EQ(text_of(text), Files::k_from_bytes);
  Lines lines({files.from});
  EXPECT_TRUE(file2lines(lines.get(0), lines));
  ASSERT_EQ(lines.length(), 1);
  EXPECT_EQ(text_of(lines.get(0)), Files::k_from_bytes);
}

TEST(zxsys2, a_device_and_what_only_seems_empty_are_read_to_their_end) {
  EXPECT_EQ(text_in("nul"), "");
  if (kit::on_windows()) return;
  // The system makes these up, and gives them no size.
  EXPECT_EQ(fs::file_size("/proc/version"), 0u);
  EXPECT_EQ(text_in("\\proc\\version"), read_file("/proc/version"));
}

ZX_CASE(zxsys2_reads_its_input) {
  init_zxlib_args(argc, argv);
  zxStr text;
  const int is_read = file2str("-", text) ? 1 : 0;
  const int sum = crc16(text.c_str(), static_cast<std::size_t>(text.length()));
  oprint("#:#:#", is_read, text.length(), sum);
  return 0;
}

// The checksum bit by bit: polynomial 0x1021, the highest bit first, from
// 0xFFFF on.
std::uint32_t checksum(const std::string& bytes) {
  std::uint32_t crc = 0xFFFF;
  for (const char byte : bytes) {
    for (int bit = 7; bit >= 0; --bit) {
      const std::uint32_t in = (static_cast<unsigned char>(byte) >> bit) & 1;
      const bool is_odd = ((crc >> 15) ^ in) != 0;
      crc = (crc << 1) & 0xFFFF;
      if (is_odd) crc ^= 0x1021;
    }
  }
  return crc;
}

TEST(zxsys2, a_pipe_is_read_to_its_end) {
  for (const std::size_t size : {0, 10, 65'536, 300'000}) {
    kit::ProcessOptions options;
    options.input = some_bytes(size);
    EXPECT_EQ(kit::run_case("zxsys2_reads_its_input", {}, options).out,
              "1:" + std::to_string(size) + ":" +
                  std::to_string(checksum(options.input)));
  }
}

TEST(zxsys2, a_failed_read_of_a_text_is_fatal) {
  const Files files;
  write_file(files.from, some_bytes(200'000));
  for (const int n : {1, 2}) {
    Faults faults;
    faults.fail_nth(Call::read, n);
    expect_failure(
        [&] {
          zxStr text;
          file2str(files.from.c_str(), text);
        },
        1014, "read: " + quoted(files.from) + " operation failed", files.from);
    faults.fail_nth(Call::read, n);
    kit::with_failures_dropped([&] {
      zxStr text;
      EXPECT_FALSE(file2str(files.from.c_str(), text));
    });
  }
}

Names lines_in(const std::string& name) {
  Lines lines({"before", "before"});
  EXPECT_TRUE(file2lines(name.c_str(), lines)) << name;
  Names texts;
  for (const zxStr& line : lines) texts.push_back(text_of(line));
  return texts;
}

TEST(zxsys2, lines_lose_one_line_end_each) {
  const Files files;
  const struct {
    std::string bytes;
    Names lines;
  } rows[] = {
      {"", {}},
      {"a", {"a"}},
      {"a\n", {"a"}},
      {"a\r\nb\r\n", {"a", "b"}},
      {"a\nb", {"a", "b"}},
      {"\n", {""}},
      {"\r\n\n", {"", ""}},
      {"a\n\r\n\nb", {"a", "", "", "b"}},
      {"a\r", {"a\r"}},
      {"\r", {"\r"}},
      {"a\r\r\n", {"a\r"}},
      {"a\rb\n", {"a\rb"}},
      {" a \t\n", {" a \t"}},
      {std::string("a\0b\n\0\n", 6),
       {std::string("a\0b", 3), std::string("\0", 1)}},
      {"a\x1a\nb\n", {"a\x1a", "b"}},
  };
  for (const auto& row : rows) {
    write_file(files.to, row.bytes);
    EXPECT_EQ(lines_in(files.to), row.lines);
  }
}

TEST(zxsys2, lines_that_were_written_are_read_again) {
  const Files files;
  Names lines;
  for (int i = 0; i < 3000; ++i)
    lines.push_back(std::string(static_cast<std::size_t>(i % 300), 'x'));
  EXPECT_TRUE(lines2file(files.to.c_str(), Lines(lines)));
  EXPECT_EQ(lines_in(files.to), lines);
}

Names settings_in(const std::string& name, const char* comment = nullptr) {
  Lines lines({"before"});
  EXPECT_TRUE(file2conflines(name.c_str(), lines, comment)) << name;
  Names texts;
  for (const zxStr& line : lines) texts.push_back(text_of(line));
  return texts;
}

TEST(zxsys2, lines_of_settings_are_cut_trimmed_and_dropped_if_empty) {
  const Files files;
  const struct {
    const char* bytes;
    const char* comment;
    Names lines;
  } rows[] = {
      {"", nullptr, {}},
      {"a\r\n b \r\n\t\r\n\r\n", nullptr, {"a", "b"}},
      {"# all\n  # all\na # part\n#", nullptr, {"a"}},
      {"a#b#c", nullptr, {"a"}},
      {"a \"#\" b\n'#'\n", nullptr, {"a \"", "'"}},
      {"a ; b % c # d\n% a\n", ";%", {"a"}},
      {"a # b\n", ";", {"a # b"}},
      {"# a\n", "", {"# a"}},
      {"a\r", nullptr, {"a"}},
  };
  for (const auto& row : rows) {
    write_file(files.to, row.bytes);
    EXPECT_EQ(settings_in(files.to, row.comment), row.lines) << row.bytes;
  }
}

// The two operations that read lines.
using LineReader = bool (*)(const char* name, zxQVA<zxStr>& lines);
constexpr LineReader k_line_readers[] = {
    [](const char* name, zxQVA<zxStr>& lines) {
      return file2lines(name, lines);
    },
    [](const char* name, zxQVA<zxStr>& lines) {
      return file2conflines(name, lines);
    }};

TEST(zxsys2, what_cannot_be_opened_leaves_no_lines) {
  const Files files;
  for (const LineReader read : k_line_readers) {
    for (const std::string& name :
         {files.missing, files.in_missing_folder, files.folder.path()}) {
      Lines lines({"before"});
      EXPECT_FALSE(read(name.c_str(), lines)) << name;
      EXPECT_EQ(lines.length(), 0) << name;
    }
  }
}

TEST(zxsys2, a_failed_read_of_lines_is_fatal) {
  const Files files;
  write_file(files.from, "first\nsecond");
  for (const LineReader read : k_line_readers) {
    for (const int n : {1, 2}) {  // the second reads behind the last byte
      Faults faults;
      faults.fail_nth(Call::read, n);
      expect_failure(
          [&] {
            zxQVA<zxStr> lines;
            read(files.from.c_str(), lines);
          },
          1029, "gets: file error (" + files.from + ")", files.from);
      faults.fail_nth(Call::read, n);
      kit::with_failures_dropped([&] {
        zxQVA<zxStr> lines;
        EXPECT_FALSE(read(files.from.c_str(), lines));
      });
    }
  }
}

// ---- copying between open files

// What copy_stream() makes of `bytes` from position `start` on.
std::string copied(const Files& files, const std::string& bytes,
                   std::int32_t start, std::int32_t size) {
  write_file(files.from, bytes);
  zxBFile in;
  in.open_or_die(files.from.c_str());
  in.seek(start);
  zxBFile out;
  out.create(files.to.c_str());
  out.puts("<");
  copy_stream(in, out, size);
  out.puts(">");
  EXPECT_TRUE(out.close());
  return read_file(files.to);
}

TEST(zxsys2, a_stream_is_copied_to_its_end_or_by_a_size) {
  const Files files;
  EXPECT_EQ(copied(files, "abcdef", 0, -1), "<abcdef>");
  EXPECT_EQ(copied(files, "abcdef", 2, -1), "<cdef>");
  EXPECT_EQ(copied(files, "abcdef", 6, -1), "<>");
  EXPECT_EQ(copied(files, "abcdef", 0, 0), "<>");
  EXPECT_EQ(copied(files, "abcdef", 1, 3), "<bcd>");
  EXPECT_EQ(copied(files, "abcdef", 0, 6), "<abcdef>");
}

TEST(zxsys2, blocks_of_a_stream_are_copied_in_their_order) {
  const Files files;
  const std::string bytes = some_bytes(200'000);
  for (const std::int32_t size :
       {49'151, 49'152, 49'153, 98'304, 98'305, 199'999}) {
    const std::string part = bytes.substr(1, static_cast<std::size_t>(size));
    EXPECT_TRUE(copied(files, bytes, 1, size) == "<" + part + ">") << size;
    EXPECT_TRUE(copied(files, "-" + part, 1, -1) == "<" + part + ">") << size;
  }
}

TEST(zxsys2, a_stream_that_has_too_few_bytes_is_fatal) {
  const Files files;
  for (const std::int32_t size : {13, 49'152, 49'153, 0x7FFFFFFF}) {
    expect_failure([&] { copied(files, "the new text", 0, size); }, 1014,
                   "read: " + quoted(files.from) + " operation failed",
                   files.from);
    kit::with_failures_dropped(
        [&] { EXPECT_EQ(copied(files, "the new text", 0, size), "<>"); });
  }
  zxBFile in;
  in.open_or_die(files.from.c_str());
  zxBFile out;
  out.create(files.to.c_str());
  EXPECT_ASSERTION(copy_stream(in, out, -2), "zxsys2_data");
}

// ---- adding a file to another

TEST(zxsys2, a_file_is_added_to_the_end_of_another) {
  const Files files;
  append_file(files.from.c_str(), files.to.c_str());
  const std::string both = std::string(Files::k_to_bytes) + Files::k_from_bytes;
  EXPECT_EQ(read_file(files.to), both);
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  append_file(files.from.c_str(), files.missing.c_str());
  EXPECT_EQ(read_file(files.missing), Files::k_from_bytes);
  const std::string bytes = some_bytes(100'000);
  write_file(files.from, bytes);
  append_file(files.from.c_str(), files.to.c_str());
  EXPECT_TRUE(read_file(files.to) == both + bytes);
}

void expect_no_addition(const Files& files, const std::string& to) {
  SCOPED_TRACE(to);
  const auto add = [&] { append_file(files.from.c_str(), to.c_str()); };
  EXPECT_ASSERTION(add(), "zxsys2_data");
  kit::with_failures_dropped(add);
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
}

TEST(zxsys2, a_file_is_not_added_to_itself) {
  const Files files;
  const std::string& folder = files.folder.path();
  expect_no_addition(files, files.from);
  expect_no_addition(files, folder + "\\FROM");
  expect_no_addition(files, folder + "\\.\\from");
  const std::string twin = files.folder.file("twin");
  std::error_code error;
  fs::create_hard_link(files.from, twin, error);
  if (!error) expect_no_addition(files, twin);
  if (kit::make_link(files.from, files.folder.file("link")))
    expect_no_addition(files, files.folder.file("link"));
}

TEST(zxsys2, each_failure_of_adding_has_its_message) {
  const Files files;
  make_read_only(files.to);
  const auto expect_no_source = [&](const std::string& from) {
    const auto add = [&] { append_file(from.c_str(), files.missing.c_str()); };
    expect_failure(add, 1002,
                   "open: Can't open file " + quoted(from) + " for reading",
                   from);
    kit::with_failures_dropped(add);
  };
  expect_no_source(files.in_missing_folder);
  expect_no_source(files.missing);
  expect_no_source(files.folder.path());
  for (const std::string& to :
       {files.to, files.folder.path(), files.in_missing_folder}) {
    const auto add = [&] { append_file(files.from.c_str(), to.c_str()); };
    expect_failure(add, 1004,
                   "create: Can't open file " + quoted(to) + " for writing",
                   to);
    kit::with_failures_dropped(add);
  }
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, each_failed_call_of_adding_has_its_message) {
  const Files files;
  write_file(files.from, some_bytes(200'000));
  const struct {
    Call call;
    int n;
    int number;
    std::string message;
    std::string name;
  } rows[] = {
      {Call::read, 1, 1014, "read: '%' operation failed", files.from},
      {Call::read, 2, 1014, "read: '%' operation failed", files.from},
      {Call::write, 1, 1016, "write: failed on '%'", files.to},
      {Call::close, 1, 1010, "close: '%' failed", files.from},
      {Call::close, 2, 1010, "close: '%' failed", files.to},
  };
  for (const auto& row : rows) {
    std::string message = row.message;
    message.replace(message.find('%'), 1, row.name);
    const auto add = [&] { append_file(files.from.c_str(), files.to.c_str()); };
    Faults faults;
    faults.fail_nth(row.call, row.n);
    expect_failure(add, row.number, message, row.name);
    faults.fail_nth(row.call, row.n);
    kit::with_failures_dropped(add);
    EXPECT_TRUE(read_file(files.to).starts_with(Files::k_to_bytes));
  }
}

// ---- comparing

std::int32_t compared(const Files& files) {
  const std::int32_t result =
      compare_files(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(compare_files(files.to.c_str(), files.from.c_str()), result);
  EXPECT_EQ(same_files(files.from.c_str(), files.to.c_str()), result < 2);
  return result;
}

TEST(zxsys2, files_that_hold_the_same_differ_in_whole_seconds_alone) {
  if (kit::on_windows()) GTEST_SKIP() << "tests can set no parts of seconds";
  const Files files;
  for (const std::size_t size : {0, 1, 24'576, 100'000}) {
    write_file(files.from, some_bytes(size));
    write_file(files.to, some_bytes(size));
    const std::chrono::sys_seconds second{std::chrono::seconds(1'000'000'000)};
    const auto time = std::chrono::file_clock::from_sys(second);
    const auto part = std::chrono::milliseconds(999);
    fs::last_write_time(files.from, time);
    fs::last_write_time(files.to, time);
    EXPECT_EQ(compared(files), 0);
    fs::last_write_time(files.to, time + part);
    EXPECT_EQ(compared(files), 0);
    fs::last_write_time(files.to, time + std::chrono::seconds(1));
    EXPECT_EQ(compared(files), 1);
    fs::last_write_time(files.from, time + part);
    EXPECT_EQ(compared(files), 1);
  }
}

TEST(zxsys2, the_times_of_two_files_decide_when_their_bytes_agree) {
  const Files files;
  write_file(files.to, Files::k_from_bytes);
  fs::last_write_time(files.to, fs::last_write_time(files.from));
  EXPECT_EQ(compared(files), 0);
  set_time(files.to, 10);
  EXPECT_EQ(compared(files), 1);
}

TEST(zxsys2, files_differ_in_any_byte) {
  const Files files;
  const std::string bytes = some_bytes(100'000);
  write_file(files.from, bytes);
  for (const std::size_t place :
       {0, 1, 24'575, 24'576, 24'577, 49'152, 99'999}) {
    std::string other = bytes;
    other[place] = static_cast<char>(other[place] ^ 1);
    write_file(files.to, other);
    fs::last_write_time(files.to, fs::last_write_time(files.from));
    EXPECT_EQ(compared(files), 2) << place;
  }
}

TEST(zxsys2, files_of_two_sizes_and_what_is_no_file_are_unlike) {
  const Files files;
  EXPECT_EQ(compared(files), 3);
  write_file(files.to, std::string(Files::k_from_bytes) + "!");
  EXPECT_EQ(compared(files), 3);
  write_file(files.to, "");
  EXPECT_EQ(compared(files), 3);
  for (const std::string& other :
       {files.missing, files.in_missing_folder, files.folder.path()}) {
    EXPECT_EQ(compare_files(files.from.c_str(), other.c_str()), 3) << other;
    EXPECT_EQ(compare_files(other.c_str(), files.from.c_str()), 3) << other;
    EXPECT_EQ(compare_files(other.c_str(), other.c_str()), 3) << other;
    EXPECT_FALSE(same_files(other.c_str(), other.c_str())) << other;
  }
}

TEST(zxsys2, a_file_is_the_same_as_itself) {
  const Files files;
  EXPECT_EQ(compare_files(files.from.c_str(), files.from.c_str()), 0);
  EXPECT_TRUE(same_files(files.from.c_str(), files.from.c_str()));
}

TEST(zxsys2, a_failed_read_of_a_comparison_is_fatal_and_then_they_differ) {
  const Files files;
  write_file(files.to, Files::k_from_bytes);
  // Each file is read up to its end before the other.
  for (const int n : {1, 2, 3, 4}) {
    SCOPED_TRACE(n);
    const std::string& name = n <= 2 ? files.from : files.to;
    const auto compare = [&] {
      return compare_files(files.from.c_str(), files.to.c_str());
    };
    Faults faults;
    faults.fail_nth(Call::read, n);
    expect_failure([&] { compare(); }, 1014,
                   "read: " + quoted(name) + " operation failed", name);
    faults.fail_nth(Call::read, n);
    kit::with_failures_dropped([&] { EXPECT_EQ(compare(), 2); });
  }
}

// The number for these digits is well known.
TEST(zxsys2, the_model_of_the_checksum_is_the_right_one) {
  EXPECT_EQ(checksum("123456789"), 0x29B1u);
}

TEST(zxsys2, the_checksum_is_that_of_all_bytes) {
  const Files files;
  for (const std::size_t size :
       {0, 1, 9, 24'575, 24'576, 24'577, 49'152, 100'000}) {
    const std::string bytes = some_bytes(size);
    write_file(files.from, bytes);
    EXPECT_EQ(file_crc(files.from.c_str()), checksum(bytes)) << size;
  }
  write_file(files.from, "123456789");
  EXPECT_EQ(file_crc(files.from.c_str()), 0x29B1u);
}

TEST(zxsys2, each_failure_of_a_checksum_has_its_message) {
  const Files files;
  for (const std::string& name : {files.missing, files.folder.path()}) {
    expect_failure([&] { file_crc(name.c_str()); }, 1002,
                   "open: Can't open file " + quoted(name) + " for reading",
                   name);
    kit::with_failures_dropped(
        [&] { EXPECT_EQ(file_crc(name.c_str()), checksum("")); });
  }
  const auto sum = [&] { file_crc(files.from.c_str()); };
  Faults faults;
  for (const int n : {1, 2}) {  // the second reads behind the last byte
    faults.fail_nth(Call::read, n);
    expect_failure(sum, 1014,
                   "read: " + quoted(files.from) + " operation failed",
                   files.from);
    faults.fail_nth(Call::read, n);
    kit::with_failures_dropped(sum);
  }
  faults.fail_nth(Call::close, 1);
  expect_failure(sum, 1010, "close: " + quoted(files.from) + " failed",
                 files.from);
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
}

// ---- deleting

TEST(zxsys2, deleting_in_three_ways_deletes) {
  const struct {
    const char* label;
    std::function<void(const char*)> run;
  } rows[] = {
      {"try", [](const char* n) { EXPECT_TRUE(try_delete(n)); }},
      {"delefile", [](const char* n) { delefile(n); }},
      {"delfile", [](const char* n) { delfile(n); }},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.label);
    const Files files;
    row.run(files.from.c_str());
    EXPECT_EQ(names_in(files.folder.path()), (Names{"to"}));
  }
}

TEST(zxsys2, a_missing_file_is_deleted_already_but_for_delfile) {
  const Files files;
  EXPECT_TRUE(try_delete(files.missing.c_str()));
  delefile(files.missing.c_str());
  expect_failure([&] { delfile(files.missing.c_str()); }, 1026,
                 "delfile: cant del " + quoted(files.missing), files.missing);
}

TEST(zxsys2, what_cannot_be_deleted_is_told) {
  const Files files;
  make_read_only(files.from);
  for (const std::string& name :
       {files.from, files.folder.path(), files.in_missing_folder}) {
    SCOPED_TRACE(name);
    EXPECT_FALSE(try_delete(name.c_str()));
    expect_failure([&] { delefile(name.c_str()); }, 1027,
                   "delefile: cant del " + quoted(name), name);
    expect_failure([&] { delfile(name.c_str()); }, 1026,
                   "delfile: cant del " + quoted(name), name);
    kit::with_failures_dropped([&] {
      delefile(name.c_str());
      delfile(name.c_str());
    });
  }
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

// ---- copying

TEST(zxsys2, a_copy_has_the_bytes_the_time_and_the_permissions) {
  const Files files;
  set_time(files.from, 1000);
  fs::permissions(files.from, fs::perms::owner_read | fs::perms::owner_write |
                                  fs::perms::others_read);
  cpfile(files.from.c_str(), files.missing.c_str());
  EXPECT_EQ(read_file(files.missing), Files::k_from_bytes);
  EXPECT_EQ(fs::last_write_time(files.missing),
            fs::last_write_time(files.from));
  EXPECT_EQ(fs::status(files.missing).permissions(),
            fs::status(files.from).permissions());
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "none", "to"}));
}

TEST(zxsys2, a_copy_of_what_may_not_be_written_may_not_be_either) {
  const Files files;
  make_read_only(files.from);
  cpfile(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(read_file(files.to), Files::k_from_bytes);
  EXPECT_TRUE(is_read_only(files.to));
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_copy_passes_over_a_name_that_is_taken_meanwhile) {
  const Files files;
  Faults faults;
  faults.fail_nth(Call::open, 2, zxplat::k_err_exists_on_create);
  cpfile(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(faults.count(Call::open), 3);
  EXPECT_EQ(read_file(files.to), Files::k_from_bytes);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, copies_of_every_size_are_complete) {
  const Files files;
  for (const std::size_t size :
       {0, 1, 49'151, 49'152, 49'153, 65'536, 98'304, 98'305, 1'000'000}) {
    const std::string bytes = some_bytes(size);
    write_file(files.from, bytes);
    cpfile(files.from.c_str(), files.to.c_str());
    EXPECT_TRUE(read_file(files.to) == bytes) << size;
  }
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_file_may_be_copied_onto_itself) {
  const Files files;
  cpfile(files.from.c_str(), files.from.c_str());
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_copy_without_a_folder_goes_into_the_working_directory) {
  const Files files;
  const WorkingIn there(files.folder.path());
  cpfile("from", "copy");
  EXPECT_EQ(read_file("copy"), Files::k_from_bytes);
  EXPECT_EQ(names_in("."), (Names{"copy", "from", "to"}));
}

TEST(zxsys2, a_missing_source_of_a_copy_is_fatal) {
  const Files files;
  const std::string message =
      "open: Can't open file " + quoted(files.missing) + " for reading";
  expect_failure([&] { cpfile(files.missing.c_str(), files.to.c_str()); }, 1002,
                 message, files.missing);
  kit::with_failures_dropped(
      [&] { cpfile(files.missing.c_str(), files.to.c_str()); });
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_copy_into_a_missing_folder_finds_no_name) {
  const Files files;
  const std::uint32_t tried = names_tried(files.folder);
  const Ticks zero(0);
  const std::string last =
      files.missing + "\\tmp" + std::to_string(tried + 30) + ".cpy";
  expect_failure(
      [&] { cpfile(files.from.c_str(), files.in_missing_folder.c_str()); },
      1037, "uniqfile: failed to find on " + quoted(last), last);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_copy_onto_what_cannot_be_deleted_is_fatal) {
  const Files files;
  make_read_only(files.to);
  for (const std::string& target : {files.to, files.folder.path()}) {
    expect_failure([&] { cpfile(files.from.c_str(), target.c_str()); }, 1027,
                   "delefile: cant del " + quoted(target), target);
  }
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  // The copy is gone again.
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

// A step of a copy that fails: the call of the system, and what is told.
// The name in the message is that of the source or of the temporary copy.
struct CopyFault {
  Call call;
  int n;
  int number;
  const char* message;  // "%" stands for the name
  bool names_source;
};

constexpr CopyFault k_copy_faults[] = {
    {Call::open, 1, 1002, "open: Can't open file '%' for reading", true},
    {Call::open, 2, 1004, "create: Can't open file '%' for writing", false},
    {Call::read, 1, 1014, "read: '%' operation failed", true},
    {Call::read, 2, 1014, "read: '%' operation failed", true},
    {Call::write, 1, 1016, "write: failed on '%'", false},
    {Call::write, 2, 1016, "write: failed on '%'", false},
    {Call::close, 1, 1010, "close: '%' failed", true},
    {Call::close, 2, 1010, "close: '%' failed", false},
};

// Only where the source is to go does the copy have to be on the device.
constexpr CopyFault k_device_fault = {Call::flush, 1, 1020,
                                      "flush: '%' operation failed", false};

std::string filled(std::string text, const std::string& argument) {
  return text.replace(text.find('%'), 1, argument);
}

// The names of temporary copies in a folder.
Names copies_in(const std::string& folder) {
  Names names = names_in(folder);
  std::erase_if(
      names, [](const std::string& name) { return !name.ends_with(".cpy"); });
  return names;
}

// Runs `copy` with a fault: the old target must keep its bytes, and so must
// the source.  What the copy had come to lies beside the target.
void expect_copy_fault(const CopyFault& fault, const Files& files,
                       const std::string& target,
                       const std::function<void()>& copy) {
  SCOPED_TRACE(testing::Message()
               << kit::name_of(fault.call) << ' ' << fault.n);
  const std::string bytes(200'000, 'x');  // written in the middle as well
  write_file(files.from, bytes);
  write_file(target, Files::k_to_bytes);
  const std::string folder = fs::path(target).parent_path().string();
  const std::uint32_t tried = names_tried(files.folder);
  const Ticks zero(0);
  const std::string copy_name = "tmp" + std::to_string(tried + 1) + ".cpy";
  const std::string shown = text_of(dir_part(target.c_str())) + copy_name;
  const std::string& name = fault.names_source ? files.from : shown;
  {
    Faults faults;
    faults.fail_nth(fault.call, fault.n, zxplat::k_err_disk_full);
    expect_failure(copy, fault.number, filled(fault.message, name), name);
  }
  EXPECT_EQ(read_file(target), Files::k_to_bytes);
  EXPECT_TRUE(read_file(files.from) == bytes);
  const Names copies = copies_in(folder);
  EXPECT_EQ(std::count(copies.begin(), copies.end(), copy_name),
            fault.call == Call::open ? 0 : 1);
}

TEST(zxsys2, a_copy_that_fails_half_way_leaves_the_old_target) {
  const Files files;
  for (const CopyFault& fault : k_copy_faults)
    expect_copy_fault(fault, files, files.to,
                      [&] { cpfile(files.from.c_str(), files.to.c_str()); });
}

TEST(zxsys2, a_copy_is_not_forced_to_the_device) {
  const Files files;
  const Faults calls;
  cpfile(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(calls.count(Call::flush), 0);
}

// Runs `copy` with a fault that is dropped: nothing is replaced or lost.
void expect_dropped_copy_fault(const CopyFault& fault, const Files& files,
                               const std::string& target,
                               const std::function<void()>& copy) {
  // The bytes are all there by the time that the source is closed.
  if (fault.call == Call::close && fault.n == 1) return;
  SCOPED_TRACE(testing::Message()
               << kit::name_of(fault.call) << ' ' << fault.n);
  const std::string bytes(200'000, 'x');
  write_file(files.from, bytes);
  write_file(target, Files::k_to_bytes);
  {
    Faults faults;
    faults.fail_nth(fault.call, fault.n);
    kit::with_failures_dropped(copy);
  }
  EXPECT_EQ(read_file(target), Files::k_to_bytes);
  EXPECT_TRUE(read_file(files.from) == bytes);
}

TEST(zxsys2, behind_dropped_failures_an_incomplete_copy_replaces_nothing) {
  const Files files;
  for (const CopyFault& fault : k_copy_faults)
    expect_dropped_copy_fault(fault, files, files.to, [&] {
      cpfile(files.from.c_str(), files.to.c_str());
    });
}

// What a copy may be read by while it is no more than begun.
TEST(zxsys2, a_copy_is_its_owners_alone_until_it_is_complete) {
  if (kit::on_windows()) GTEST_SKIP() << "every file can be read here";
  const Files files;
  fs::permissions(files.from, fs::perms::owner_read | fs::perms::owner_write);
  Faults faults;
  faults.fail_nth(Call::write, 1);
  kit::with_failures_dropped(
      [&] { cpfile(files.from.c_str(), files.to.c_str()); });
  const Names left = copies_in(files.folder.path());
  ASSERT_EQ(left.size(), 1u);
  EXPECT_EQ(fs::status(files.folder.file(left[0])).permissions(),
            fs::perms::owner_read | fs::perms::owner_write);
}

TEST(zxsys2, a_copy_that_cannot_get_its_name_is_deleted) {
  const Files files;
  Faults faults;
  faults.fail_nth(Call::rename, 1, zxplat::k_err_denied);
  expect_failure([&] { cpfile(files.from.c_str(), files.to.c_str()); }, 1038,
                 "cpfile: failed to rename tmp to " + quoted(files.to),
                 files.to);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from"}));
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
}

// The copy has the permissions of its source by then.
TEST(zxsys2, a_copy_that_may_not_be_written_is_deleted_all_the_same) {
  const Files files;
  make_read_only(files.from);
  {
    Faults faults;
    faults.fail_nth(Call::rename, 1, zxplat::k_err_denied);
    expect_failure([&] { cpfile(files.from.c_str(), files.missing.c_str()); },
                   1038,
                   "cpfile: failed to rename tmp to " + quoted(files.missing),
                   files.missing);
  }
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
  make_read_only(files.to);
  for (const std::string& target : {files.to, files.from}) {
    expect_failure([&] { cpfile(files.from.c_str(), target.c_str()); }, 1027,
                   "delefile: cant del " + quoted(target), target);
    EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
  }
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
}

TEST(zxsys2, a_copy_whose_time_cannot_be_set_fails_an_assertion) {
  const Files files;
  // The source goes while it is being closed.
  static const Files* now;
  now = &files;
  Faults faults;
  zxplat::files.close = [](zxplat::Fd fd) {
    const bool closed = zxplat::system_files.close(fd);
    fs::remove(now->from);
    return closed;
  };
  expect_assertion_at([&] { cpfile(files.from.c_str(), files.to.c_str()); },
                      "zxsys2:174");
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
}

TEST(zxsys2, the_reason_of_a_failed_rename_of_a_copy_outlives_its_deletion) {
  const Files files;
  Faults faults;
  faults.fail_nth(Call::rename, 1, 4321);
  faults.fail_nth(Call::remove, 2, 99);  // the target, the copy
  kit::with_failures_dropped(
      [&] { cpfile(files.from.c_str(), files.to.c_str()); });
  EXPECT_EQ(zxplat::last_error(), 4321);
}

// ---- moving

TEST(zxsys2, a_moved_file_has_its_new_name_alone) {
  const Files files;
  set_time(files.from, 1000);
  const auto time = fs::last_write_time(files.from);
  move_file(files.from.c_str(), files.missing.c_str());
  EXPECT_EQ(names_in(files.folder.path()), (Names{"none", "to"}));
  EXPECT_EQ(read_file(files.missing), Files::k_from_bytes);
  EXPECT_EQ(fs::last_write_time(files.missing), time);
}

TEST(zxsys2, a_moved_file_replaces_what_had_its_name) {
  const Files files;
  const Faults calls;
  move_file(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(names_in(files.folder.path()), (Names{"to"}));
  EXPECT_EQ(read_file(files.to), Files::k_from_bytes);
  EXPECT_EQ(calls.count(Call::rename), 1);
  EXPECT_EQ(calls.count(Call::open), 0);
}

TEST(zxsys2, a_file_that_may_not_be_written_can_be_moved) {
  const Files files;
  make_read_only(files.from);
  move_file(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(names_in(files.folder.path()), (Names{"to"}));
  EXPECT_TRUE(is_read_only(files.to));
}

TEST(zxsys2, a_file_is_moved_into_the_working_directory) {
  const Files files;
  const TempDir other;
  const WorkingIn there(other.path());
  move_file(files.from.c_str(), "here");
  EXPECT_EQ(read_file("here"), Files::k_from_bytes);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"to"}));
}

void expect_same_file(const Files& files, const std::string& other) {
  SCOPED_TRACE(other);
  expect_assertion_at([&] { move_file(files.from.c_str(), other.c_str()); },
                      "zxsys2:287");
  kit::with_failures_dropped(
      [&] { move_file(files.from.c_str(), other.c_str()); });
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
}

TEST(zxsys2, a_file_moved_onto_itself_fails_an_assertion_and_stays) {
  const Files files;
  expect_same_file(files, files.from);
  // The same file by other spellings.
  const std::string& folder = files.folder.path();
  expect_same_file(files, folder + "\\from");
  expect_same_file(files, folder + "\\.\\from");
  expect_same_file(files, folder + "/./from");
  expect_same_file(files, folder + "\\FROM");
  expect_same_file(files, folder + "\\..\\" +
                              fs::path(folder).filename().string() + "\\from");
  const WorkingIn there(folder);
  expect_same_file(files, "from");
  expect_same_file(files, ".\\From");
  EXPECT_EQ(names_in(folder), (Names{"from", "to"}));
}

TEST(zxsys2, a_file_under_two_names_is_not_moved_onto_itself_either) {
  const Files files;
  const std::string twin = files.folder.file("twin");
  std::error_code error;
  fs::create_hard_link(files.from, twin, error);
  if (error) GTEST_SKIP() << "there are no hard links: " << error.message();
  expect_same_file(files, twin);
  EXPECT_EQ(read_file(twin), Files::k_from_bytes);
}

TEST(zxsys2, names_that_are_the_same_text_fail_even_without_a_file) {
  const Files files;
  expect_assertion_at(
      [&] { move_file(files.missing.c_str(), files.missing.c_str()); },
      "zxsys2:287");
}

TEST(zxsys2, a_file_moved_onto_a_folder_fails_an_assertion) {
  const Files files;
  const std::string inner = files.folder.path() + "/inner";
  fs::create_directory(inner);
  for (const std::string& target :
       {inner, inner + "\\", files.folder.path() + "\\INNER"}) {
    expect_assertion_at([&] { move_file(files.from.c_str(), target.c_str()); },
                        "zxsys2:288");
    kit::with_failures_dropped(
        [&] { move_file(files.from.c_str(), target.c_str()); });
  }
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "inner", "to"}));
  EXPECT_TRUE(names_in(inner).empty());
}

TEST(zxsys2, a_missing_source_of_a_move_is_fatal_and_the_target_stays) {
  const Files files;
  for (const std::string& from : {files.missing, files.in_missing_folder}) {
    expect_failure([&] { move_file(from.c_str(), files.to.c_str()); }, 1002,
                   "open: Can't open file " + quoted(from) + " for reading",
                   from);
    kit::with_failures_dropped(
        [&] { move_file(from.c_str(), files.to.c_str()); });
    EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
  }
}

TEST(zxsys2, a_move_into_a_missing_folder_is_fatal) {
  const Files files;
  const std::string& to = files.in_missing_folder;
  expect_failure([&] { move_file(files.from.c_str(), to.c_str()); }, 1027,
                 "delefile: cant del " + quoted(to), to);
  kit::with_failures_dropped(
      [&] { move_file(files.from.c_str(), to.c_str()); });
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_move_onto_what_cannot_be_deleted_is_fatal) {
  const Files files;
  make_read_only(files.to);
  expect_failure([&] { move_file(files.from.c_str(), files.to.c_str()); }, 1027,
                 "delefile: cant del " + quoted(files.to), files.to);
  kit::with_failures_dropped(
      [&] { move_file(files.from.c_str(), files.to.c_str()); });
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
}

TEST(zxsys2, a_failed_rename_is_fatal_and_the_source_stays) {
  for (const int error : {zxplat::k_err_denied, zxplat::k_err_sharing,
                          zxplat::k_err_path_not_found}) {
    const Files files;
    const std::string both = files.from + " to " + files.to;
    Faults faults;
    faults.fail_all(Call::rename, error);
    expect_failure([&] { move_file(files.from.c_str(), files.to.c_str()); },
                   1036, "mvfile: rename fail on " + quoted(both), both);
    kit::with_failures_dropped(
        [&] { move_file(files.from.c_str(), files.to.c_str()); });
    EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
    EXPECT_EQ(faults.count(Call::open), 0);
  }
}

// Both answers of the system that ask for a copy.
constexpr int k_errors_of_devices[] = {zxplat::k_err_not_found,
                                       zxplat::k_err_other_device};

TEST(zxsys2, a_rename_that_cannot_cross_becomes_a_copy) {
  for (const int error : k_errors_of_devices) {
    SCOPED_TRACE(error);
    const Files files;
    set_time(files.from, 1000);
    const auto time = fs::last_write_time(files.from);
    Faults faults;
    faults.fail_nth(Call::rename, 1, error);
    move_file(files.from.c_str(), files.to.c_str());
    EXPECT_EQ(faults.count(Call::rename), 2);
    EXPECT_EQ(names_in(files.folder.path()), (Names{"to"}));
    EXPECT_EQ(read_file(files.to), Files::k_from_bytes);
    EXPECT_EQ(fs::last_write_time(files.to), time);
  }
}

TEST(zxsys2, a_copy_in_place_of_a_rename_is_forced_to_the_device) {
  const Files files;
  Faults faults;
  faults.fail_nth(Call::rename, 1, zxplat::k_err_other_device);
  move_file(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(faults.count(Call::flush), 1);
}

TEST(zxsys2, a_source_whose_copy_is_not_on_the_device_stays) {
  const Files files;
  Faults faults;
  faults.fail_nth(Call::rename, 1, zxplat::k_err_other_device);
  faults.fail_nth(Call::flush, 1);
  kit::with_failures_dropped(
      [&] { move_file(files.from.c_str(), files.to.c_str()); });
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
}

TEST(zxsys2, a_copy_in_place_of_a_rename_that_gets_no_name_keeps_the_source) {
  for (const int error : k_errors_of_devices) {
    SCOPED_TRACE(error);
    const Files files;
    Faults faults;
    faults.fail_all(Call::rename, error);
    expect_failure([&] { move_file(files.from.c_str(), files.to.c_str()); },
                   1038, "cpfile: failed to rename tmp to " + quoted(files.to),
                   files.to);
    EXPECT_EQ(names_in(files.folder.path()), (Names{"from"}));
    kit::with_failures_dropped(
        [&] { move_file(files.from.c_str(), files.to.c_str()); });
    EXPECT_EQ(names_in(files.folder.path()), (Names{"from"}));
    EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  }
}

TEST(zxsys2, a_source_that_stays_behind_its_copy_is_fatal) {
  const Files files;
  Faults faults;
  faults.fail_nth(Call::rename, 1, zxplat::k_err_other_device);
  faults.fail_nth(Call::remove, 3);  // target, target again, source
  expect_failure([&] { move_file(files.from.c_str(), files.to.c_str()); }, 1026,
                 "delfile: cant del " + quoted(files.from), files.from);
  EXPECT_EQ(faults.count(Call::remove), 3);
  EXPECT_EQ(read_file(files.to), Files::k_from_bytes);
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

// A folder on another device, for one test.
class OtherDevice {
 public:
  OtherDevice() : parent(kit::other_device_folder()) {
    if (parent.empty()) return;
    folder = parent + k_separator + "zxkit-" +
             std::to_string(
                 std::chrono::steady_clock::now().time_since_epoch().count());
    fs::create_directory(folder);
  }
  OtherDevice(const OtherDevice&) = delete;
  OtherDevice& operator=(const OtherDevice&) = delete;
  ~OtherDevice() {
    std::error_code ignored;
    if (!folder.empty()) fs::remove_all(folder, ignored);
  }

  bool is_there() const { return !folder.empty(); }
  std::string file(const std::string& name) const {
    return folder + k_separator + name;
  }
  const std::string& path() const { return folder; }

 private:
  static constexpr char k_separator = '/';
  std::string parent;
  std::string folder;
};

TEST(zxsys2, a_file_is_moved_to_another_device) {
  const OtherDevice device;
  if (!device.is_there()) GTEST_SKIP() << "there is one device only";
  const Files files;
  set_time(files.from, 1000);
  fs::permissions(files.from, fs::perms::owner_read | fs::perms::owner_write);
  const auto time = fs::last_write_time(files.from);
  const auto permissions = fs::status(files.from).permissions();
  const std::string target = device.file("target");
  move_file(files.from.c_str(), target.c_str());
  EXPECT_EQ(names_in(files.folder.path()), (Names{"to"}));
  EXPECT_EQ(names_in(device.path()), (Names{"target"}));
  EXPECT_EQ(read_file(target), Files::k_from_bytes);
  EXPECT_EQ(fs::status(target).permissions(), permissions);
  EXPECT_LT(std::chrono::abs(fs::last_write_time(target) - time),
            std::chrono::seconds(1));
  // Over an old file there, and back.
  move_file(files.to.c_str(), target.c_str());
  EXPECT_EQ(read_file(target), Files::k_to_bytes);
  move_file(target.c_str(), files.from.c_str());
  EXPECT_EQ(read_file(files.from), Files::k_to_bytes);
  EXPECT_TRUE(names_in(device.path()).empty());
}

TEST(zxsys2, across_devices_the_old_target_outlives_every_failed_copy) {
  const OtherDevice device;
  if (!device.is_there()) GTEST_SKIP() << "there is one device only";
  const Files files;
  const std::string target = device.file("target");
  const auto move = [&] { move_file(files.from.c_str(), target.c_str()); };
  for (const CopyFault& fault : k_copy_faults)
    expect_copy_fault(fault, files, target, move);
  expect_copy_fault(k_device_fault, files, target, move);
  for (const CopyFault& fault : k_copy_faults)
    expect_dropped_copy_fault(fault, files, target, move);
  expect_dropped_copy_fault(k_device_fault, files, target, move);
}

TEST(zxsys2, across_devices_an_undeletable_target_is_fatal_and_stays) {
  const OtherDevice device;
  if (!device.is_there()) GTEST_SKIP() << "there is one device only";
  const Files files;
  const std::string target = device.file("target");
  write_file(target, Files::k_to_bytes);
  make_read_only(target);
  expect_failure([&] { move_file(files.from.c_str(), target.c_str()); }, 1027,
                 "delefile: cant del " + quoted(target), target);
  EXPECT_EQ(read_file(target), Files::k_to_bytes);
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  fs::permissions(target, fs::perms::owner_write, fs::perm_options::add);
}

TEST(zxsys2, across_devices_a_missing_source_leaves_the_target) {
  const OtherDevice device;
  if (!device.is_there()) GTEST_SKIP() << "there is one device only";
  const Files files;
  const std::string target = device.file("target");
  write_file(target, Files::k_to_bytes);
  expect_failure(
      [&] { move_file(files.missing.c_str(), target.c_str()); }, 1002,
      "open: Can't open file " + quoted(files.missing) + " for reading",
      files.missing);
  EXPECT_EQ(read_file(target), Files::k_to_bytes);
}

TEST(zxsys2, a_file_is_copied_to_another_device) {
  const OtherDevice device;
  if (!device.is_there()) GTEST_SKIP() << "there is one device only";
  const Files files;
  const std::string target = device.file("target");
  const Faults calls;
  cpfile(files.from.c_str(), target.c_str());
  EXPECT_EQ(calls.count(Call::flush), 0);
  EXPECT_EQ(read_file(target), Files::k_from_bytes);
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
  EXPECT_EQ(names_in(device.path()), (Names{"target"}));
}

// Its arguments: a folder that is a disk of 64 kilobytes, and a larger file.
ZX_CASE(zxsys2_fills_a_disk) {
  kit::start();
  const std::string disk = argv[1];
  const std::string from = argv[2];
  const std::string target = disk + "/target";
  write_file(target, Files::k_to_bytes);
  const std::string bytes = read_file(from);
  for (const auto operation : {cpfile, move_file}) {
    const auto run = [&] { operation(from.c_str(), target.c_str()); };
    const std::string message = kit::failure_of(run).message;
    kit::with_failures_dropped(run);
    kit::say(message.substr(0, 22));
    kit::say(read_file(target) == Files::k_to_bytes ? ", target kept" : "");
    kit::say(read_file(from) == bytes ? ", source kept; " : "");
  }
  for (const Writer& writer : writers()) {
    const std::string name = disk + "/new";
    const bool is_written = writer.attempt(name.c_str(), false);
    kit::say(is_written ? "written; " : "not written; ");
  }
  const WorkingIn there(disk);
  kit::say(space_for(".") ? "space" : "no space");
  return 0;
}

// Runs a script with arguments where what it mounts is seen by nobody else
// and goes with it.
kit::ProcessResult run_with_mounts(const std::string& script,
                                   const std::vector<std::string>& arguments,
                                   const kit::ProcessOptions& options) {
  std::vector<std::string> command = {
      "sh", "-c", "exec unshare -m sh -c \"$0\" sh \"$@\"", script};
  command.insert(command.end(), arguments.begin(), arguments.end());
  return kit::run_process(command, options);
}

TEST(zxsys2, a_full_disk_is_told_and_loses_neither_source_nor_target) {
  if (kit::on_windows()) GTEST_SKIP() << "there is no disk to fill here";
  const std::string mount = "mount -t tmpfs -o size=64k tmpfs \"$1\"";
  const TempDir disk;
  const Files files;
  write_file(files.from, some_bytes(200'000));
  kit::ProcessOptions options;
  options.directory = files.folder.path();
  if (run_with_mounts(mount, {disk.path()}, options).exit_code != 0)
    GTEST_SKIP() << "no disk can be mounted here";
  options.variables = {{"ZX_CASE", "zxsys2_fills_a_disk"}};
  const kit::ProcessResult process =
      run_with_mounts(mount + " && exec \"$3\" \"$1\" \"$2\"",
                      {disk.path(), files.from, kit::self_path()}, options);
  const std::string kept = "1016: write: failed on, target kept, source kept; ";
  EXPECT_EQ(process.out, kept + kept + "not written; not written; no space");
  EXPECT_EQ(process.exit_code, 0);
  EXPECT_EQ(names_in(disk.path()), Names());
}

// ---- the time of a file

TEST(zxsys2, a_file_gets_the_time_of_another) {
  const Files files;
  set_time(files.from, 1000);
  copy_time(files.from.c_str(), files.to.c_str());
  EXPECT_EQ(fs::last_write_time(files.to), fs::last_write_time(files.from));
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
}

TEST(zxsys2, a_time_that_cannot_be_copied_fails_an_assertion) {
  const Files files;
  const auto expect_at = [](const std::string& from, const std::string& to,
                            const char* place) {
    const auto copy = [&] { copy_time(from.c_str(), to.c_str()); };
    expect_assertion_at(copy, place);
    kit::with_failures_dropped(copy);
  };
  expect_at(files.missing, files.to, "zxsys2:174");
  expect_at(files.in_missing_folder, files.to, "zxsys2:174");
  expect_at(files.missing, files.missing, "zxsys2:174");
  expect_at(files.from, files.missing, "zxsys2:177");
  expect_at(files.from, files.in_missing_folder, "zxsys2:177");
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

// ---- files by a pattern

// A folder with three files, one more in a folder below, and an empty one.
class Tree {
 public:
  Tree() {
    fs::create_directories(source + "/below");
    fs::create_directory(target);
    for (const char* name : {"a.txt", "b.txt", "c.dat", "below/d.txt"})
      write_file(source + "/" + name, name);
  }

  Names sources() const { return names_in(source); }
  Names targets() const { return names_in(target); }

  const TempDir folder;
  const std::string source = folder.file("source");
  const std::string target = folder.file("target");
  const std::string texts = source + "\\*.txt";
  const std::string all_texts = source + "\\\\*.txt";
};

TEST(zxsys2, files_of_a_pattern_are_deleted) {
  const Tree tree;
  delfiles((tree.source + "\\*.none").c_str());
  EXPECT_EQ(tree.sources().size(), 4u);
  delfiles(tree.texts.c_str());
  EXPECT_EQ(tree.sources(), (Names{"below", "c.dat"}));
  delfiles(tree.all_texts.c_str());
  EXPECT_TRUE(names_in(tree.source + "/below").empty());
  delfiles((tree.source + "\\c.dat").c_str());
  EXPECT_EQ(tree.sources(), (Names{"below"}));
  delfiles((tree.source + "\\missing").c_str());
}

TEST(zxsys2, a_file_of_a_pattern_that_cannot_be_deleted_is_fatal) {
  const Tree tree;
  make_read_only(tree.source + "/a.txt");
  const kit::Failure failure =
      kit::failure_of([&] { delfiles(tree.texts.c_str()); });
  EXPECT_TRUE(failure.message.starts_with("1027: delefile: cant del '"))
      << failure.message;
  EXPECT_TRUE(failure.message.ends_with("a.txt'")) << failure.message;
  kit::with_failures_dropped([&] { delfiles(tree.texts.c_str()); });
  EXPECT_EQ(tree.sources(), (Names{"a.txt", "below", "c.dat"}));
}

TEST(zxsys2, files_of_a_pattern_are_copied) {
  const Tree tree;
  cpfiles2dir((tree.source + "\\*.none").c_str(), tree.target.c_str());
  EXPECT_EQ(tree.targets(), Names());
  cpfiles2dir(tree.texts.c_str(), tree.target.c_str());
  EXPECT_EQ(tree.targets(), (Names{"a.txt", "b.txt"}));
  EXPECT_EQ(read_file(tree.target + "/b.txt"), "b.txt");
  cpfiles2dir((tree.source + "\\c.dat").c_str(), (tree.target + "\\").c_str());
  EXPECT_EQ(tree.targets(), (Names{"a.txt", "b.txt", "c.dat"}));
  cpfiles2dir(tree.all_texts.c_str(), (tree.target + "/").c_str());
  EXPECT_EQ(tree.targets(), (Names{"a.txt", "b.txt", "c.dat", "d.txt"}));
  EXPECT_EQ(tree.sources(), (Names{"a.txt", "b.txt", "below", "c.dat"}));
}

TEST(zxsys2, files_of_a_pattern_are_moved) {
  const Tree tree;
  write_file(tree.target + "/a.txt", "old");
  mvfiles2dir(tree.texts.c_str(), tree.target.c_str());
  EXPECT_EQ(tree.targets(), (Names{"a.txt", "b.txt"}));
  EXPECT_EQ(read_file(tree.target + "/a.txt"), "a.txt");
  EXPECT_EQ(tree.sources(), (Names{"below", "c.dat"}));
  mvfiles2dir(tree.all_texts.c_str(), tree.target.c_str());
  EXPECT_EQ(tree.targets(), (Names{"a.txt", "b.txt", "d.txt"}));
}

TEST(zxsys2, files_are_copied_into_the_folder_that_they_are_in) {
  const Tree tree;
  for (int i = 0; i < 200; ++i)
    write_file(tree.source + "/" + std::to_string(i) + ".txt", "x");
  const Names before = tree.sources();
  cpfiles2dir(tree.texts.c_str(), tree.source.c_str());
  EXPECT_EQ(tree.sources(), before);
  EXPECT_EQ(read_file(tree.source + "/a.txt"), "a.txt");
}

TEST(zxsys2, files_are_not_moved_into_the_folder_that_they_are_in) {
  const Tree tree;
  const auto move = [&] {
    mvfiles2dir(tree.texts.c_str(), tree.source.c_str());
  };
  expect_assertion_at(move, "zxsys2:287");
  kit::with_failures_dropped(move);
  EXPECT_EQ(tree.sources().size(), 4u);
  EXPECT_EQ(read_file(tree.source + "/a.txt"), "a.txt");
}

TEST(zxsys2, files_by_a_pattern_need_a_directory) {
  const Tree tree;
  const std::string file = tree.source + "/c.dat";
  for (const std::string& dir :
       {tree.folder.file("none"), file, file + "\\", std::string()}) {
    SCOPED_TRACE(dir);
    const auto copy = [&] { cpfiles2dir(tree.texts.c_str(), dir.c_str()); };
    const auto move = [&] { mvfiles2dir(tree.texts.c_str(), dir.c_str()); };
    expect_failure(copy, 1034, "cpfiles2dir: bad dir name " + quoted(dir), dir);
    expect_failure(move, 1035, "mvfiles2dir: bad dir name " + quoted(dir), dir);
    kit::with_failures_dropped(copy);
    kit::with_failures_dropped(move);
  }
  EXPECT_EQ(tree.sources(), (Names{"a.txt", "b.txt", "below", "c.dat"}));
  EXPECT_EQ(tree.targets(), Names());
}

TEST(zxsys2, a_plain_name_of_no_file_is_fatal_to_copy_or_move) {
  const Tree tree;
  const std::string missing = tree.source + "\\none";
  const std::string message =
      "open: Can't open file " + quoted(missing) + " for reading";
  for (const auto operation : {cpfiles2dir, mvfiles2dir}) {
    const auto run = [&] { operation(missing.c_str(), tree.target.c_str()); };
    expect_failure(run, 1002, message, missing);
    kit::with_failures_dropped(run);
  }
  EXPECT_EQ(tree.targets(), Names());
}

// ---- making and deleting folders

TEST(zxsys2, a_directory_is_made_whatever_separators_end_its_name) {
  const TempDir folder;
  Names expected;
  for (const char* ending : {"", "\\", "/", "\\\\", "//", "/\\/\\"}) {
    const std::string name = "d" + std::to_string(expected.size());
    expected.push_back(name);
    EXPECT_TRUE(try_createdir((folder.path() + "\\" + name + ending).c_str()))
        << ending;
  }
  createdir((folder.path() + "\\last\\").c_str());
  expected.push_back("last");
  EXPECT_EQ(names_in(folder.path()), expected);
}

TEST(zxsys2, a_directory_that_cannot_be_made_is_told) {
  const Files files;
  const std::string inner = files.folder.path() + "/inner";
  fs::create_directory(inner);
  for (const std::string& name :
       {files.from, inner, inner + "\\", files.in_missing_folder,
        files.from + "\\new", std::string()}) {
    SCOPED_TRACE(name);
    EXPECT_FALSE(try_createdir(name.c_str()));
    const auto create = [&] { createdir(name.c_str()); };
    expect_failure(create, 1030, "createdir: failed " + quoted(name), name);
    kit::with_failures_dropped(create);
  }
  Faults faults;
  faults.fail_all(Call::make_folder, zxplat::k_err_denied);
  EXPECT_FALSE(try_createdir(files.missing.c_str()));
  expect_failure([&] { createdir(files.missing.c_str()); }, 1030,
                 "createdir: failed " + quoted(files.missing), files.missing);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "inner", "to"}));
  EXPECT_EQ(read_file(files.from), Files::k_from_bytes);
}

TEST(zxsys2, an_empty_directory_is_deleted) {
  const TempDir folder;
  fs::create_directory(folder.file("a"));
  fs::create_directory(folder.file("b"));
  deldir(folder.file("a").c_str());
  deldir((folder.path() + "\\b\\").c_str());
  EXPECT_EQ(names_in(folder.path()), Names());
}

TEST(zxsys2, a_directory_that_cannot_be_deleted_is_fatal) {
  const Files files;
  const std::string inner = files.folder.path() + "/inner";
  fs::create_directory(inner);
  const auto expect_stays = [](const std::string& name) {
    SCOPED_TRACE(name);
    const auto remove = [&] { deldir(name.c_str()); };
    expect_failure(remove, 1031, "del dir: failed " + quoted(name), name);
    kit::with_failures_dropped(remove);
  };
  for (const std::string& name :
       {files.folder.path(), files.from, files.missing, files.in_missing_folder,
        std::string()})
    expect_stays(name);
  Faults faults;
  faults.fail_all(Call::remove_folder, zxplat::k_err_denied);
  expect_stays(inner);
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "inner", "to"}));
}

// What folders the system was told to make, in their order.
class MadeFolders {
 public:
  MadeFolders() {
    names.clear();
    zxplat::files.make_folder = [](std::string_view name) {
      names.emplace_back(name);
      return zxplat::system_files.make_folder(name);
    };
  }
  MadeFolders(const MadeFolders&) = delete;
  MadeFolders& operator=(const MadeFolders&) = delete;
  ~MadeFolders() { zxplat::files = zxplat::system_files; }

  static inline Names names;
};

TEST(zxsys2, a_chain_of_folders_is_made_from_the_outermost_on) {
  const TempDir folder;
  const MadeFolders made;
  const std::string a = folder.path() + "\\a";
  EXPECT_TRUE(make_path((a + "\\b\\c").c_str()));
  EXPECT_EQ(made.names, (Names{a, a + "\\b", a + "\\b\\c"}));
  EXPECT_TRUE(fs::is_directory(folder.file("a/b/c")));
  EXPECT_TRUE(make_path((a + "\\b\\c").c_str()));
  EXPECT_TRUE(make_path((a + "\\b").c_str()));
  EXPECT_EQ(made.names.size(), 3u);
  make_path_or_die((a + "\\d\\e").c_str());
  EXPECT_TRUE(fs::is_directory(folder.file("a/d/e")));
}

TEST(zxsys2, the_separator_of_a_root_stays) {
  const MadeFolders made;
  for (const char* name : {"C:\\", "c:\\/", "\\", "//"})
    EXPECT_FALSE(try_createdir(name)) << name;
  EXPECT_EQ(made.names, (Names{"C:\\", "c:\\", "\\", "/"}));
}

TEST(zxsys2, separators_at_the_end_and_in_pairs_do_not_count) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  const std::string path = folder.path();
  for (const char* ending : {"\\", "/", "//", "\\\\", "/\\/\\"}) {
    EXPECT_TRUE(make_path((path + "/a/b" + ending).c_str())) << ending;
    EXPECT_TRUE(fs::is_directory("a/b")) << ending;
    fs::remove_all("a");
  }
  for (const char* chain : {"/a//b", "//a/b", "/a\\\\b", "\\a/b", "/a///b"}) {
    EXPECT_TRUE(make_path((path + chain).c_str())) << chain;
    EXPECT_TRUE(fs::is_directory("a/b")) << chain;
    fs::remove_all("a");
  }
  EXPECT_FALSE(make_path("a//b"));
  EXPECT_EQ(names_in("."), Names());
}

TEST(zxsys2, a_relative_chain_must_begin_with_a_folder_that_is_there) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  for (const char* name : {"new", "new\\", "new\\a", "new/a/b", "\\", "/"}) {
    const bool is_root = name[1] == '\0';
    EXPECT_EQ(make_path(name), is_root) << name;
  }
  EXPECT_EQ(names_in("."), Names());
  EXPECT_TRUE(make_path(".\\new"));
  EXPECT_TRUE(make_path("new\\a\\b"));
  EXPECT_TRUE(make_path("new/a"));
  EXPECT_TRUE(make_path("."));
  EXPECT_TRUE(fs::is_directory("new/a/b"));
}

TEST(zxsys2, the_native_drive_may_begin_a_chain) {
  if (kit::on_windows()) GTEST_SKIP() << "names begin with a drive anyway";
  const TempDir folder;
  const WorkingIn there(folder.path());
  EXPECT_TRUE(make_path(("c:" + folder.path() + "/a/b").c_str()));
  EXPECT_TRUE(make_path("C:x\\y"));
  EXPECT_TRUE(make_path("C:"));
  EXPECT_TRUE(make_path("C:\\"));
  EXPECT_EQ(names_in("."), (Names{"a", "x"}));
}

TEST(zxsys2, a_path_that_cannot_be_made_is_told_by_the_number_of_chg_dir) {
  const Files files;
  for (const std::string& name :
       {std::string(), files.from, files.from + "\\new", files.from + "\\a\\b",
        std::string("1:\\new"), std::string("new")}) {
    SCOPED_TRACE(name);
    EXPECT_FALSE(make_path(name.c_str()));
    const auto make = [&] { make_path_or_die(name.c_str()); };
    expect_failure(make, 1032, "chg dir: failed " + quoted(name), name);
    kit::with_failures_dropped(make);
  }
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

TEST(zxsys2, a_chain_ends_where_a_folder_cannot_be_made) {
  const TempDir folder;
  Faults faults;
  faults.fail_nth(Call::make_folder, 2, zxplat::k_err_disk_full);
  EXPECT_FALSE(make_path((folder.path() + "\\a\\b\\c").c_str()));
  EXPECT_EQ(faults.count(Call::make_folder), 2);
  EXPECT_EQ(names_in(folder.path()), Names{"a"});
  EXPECT_EQ(names_in(folder.file("a")), Names());
}

// ---- changing the working directory

TEST(zxsys2, the_working_directory_changes_and_the_old_one_comes_back) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  fs::create_directories("a/b");
  const std::string start = text_of(get_cwd());
  const struct {
    std::string name;
    std::string now;
  } rows[] = {{"a", "\\a"},       {"b\\", "\\a\\b"}, {"..", "\\a"},
              {".\\b", "\\a\\b"}, {start, ""},       {start + "\\a\\", "\\a"},
              {"..", ""},         {"a/b", "\\a\\b"}, {"", "\\a\\b"}};
  std::string before = start;
  for (const auto& row : rows) {
    EXPECT_EQ(text_of(chg_dir(row.name.c_str())), before) << row.name;
    before = start + row.now;
    EXPECT_EQ(text_of(get_cwd()), before) << row.name;
  }
  EXPECT_EQ(text_of(chg_dir("\\")), before);
  EXPECT_EQ(text_of(get_cwd()),
            in_library_form(fs::current_path().root_path().string()));
}

TEST(zxsys2, a_working_directory_that_there_is_not_is_fatal) {
  const Files files;
  const WorkingIn there(files.folder.path());
  const std::string start = text_of(get_cwd());
  for (const std::string& name :
       {files.missing, files.in_missing_folder, files.from, std::string("none"),
        std::string("C:"), std::string("1:\\")}) {
    SCOPED_TRACE(name);
    expect_failure([&] { chg_dir(name.c_str()); }, 1032,
                   "chg dir: failed " + quoted(name), name);
    kit::with_failures_dropped(
        [&] { EXPECT_EQ(text_of(chg_dir(name.c_str())), start); });
    EXPECT_EQ(text_of(get_cwd()), start);
  }
}

// ---- disks

// A disk with this room under every letter; the letters that were asked for.
class FakeDisk {
 public:
  explicit FakeDisk(const zxplat::DiskSpace& space) {
    now = space;
    letters.clear();
    zxplat::files.disk_space = [](char letter, zxplat::DiskSpace& out) {
      letters += letter == '\0' ? '0' : letter;
      out = now;
      return true;
    };
  }
  FakeDisk(const FakeDisk&) = delete;
  FakeDisk& operator=(const FakeDisk&) = delete;
  ~FakeDisk() { zxplat::files = zxplat::system_files; }

  static inline std::string letters;

 private:
  static inline zxplat::DiskSpace now;
};

TEST(zxsys2, free_space_is_counted_in_whole_units_of_sectors) {
  constexpr std::int32_t k_most = 0x7FFFFFFF;
  const struct {
    zxplat::DiskSpace space;  // clusters, sectors in each, bytes in each
    std::uint32_t unit;
    std::int32_t expected;
  } rows[] = {
      {{0, 8, 512}, 1, 0},
      {{1000, 8, 512}, 1, 4'096'000},
      // 8000 sectors are 7 times 1024 of them.
      {{1000, 8, 512}, 1024, 7 * 512},
      {{127, 8, 512}, 1024, 0},
      {{128, 8, 512}, 1024, 512},
      {{1, 1, 4096}, 1, 4096},
      {{1, 1, 512}, 2, 0},
      // 2^31 bytes are one too many.
      {{4'194'303, 1, 512}, 1, 2'147'483'136},
      {{4'194'304, 1, 512}, 1, k_most},
      {{4'194'304, 1, 512}, 2, 1 << 30},
      {{0xFFFFFFFF, 64, 4096}, 1, k_most},
      // 2^35 sectors do not fit 32 bits.
      {{std::uint64_t{1} << 32, 8, 512}, 1 << 16, 1 << 28},
      {{0xFFFFFFFF, 1, 512}, 0xFFFFFFFF, 512},
      {{0xFFFFFFFE, 1, 512}, 0xFFFFFFFF, 0},
  };
  for (const auto& row : rows) {
    const FakeDisk disk(row.space);
    EXPECT_EQ(diskfree('C', row.unit), row.expected)
        << row.space.free_clusters << ' ' << row.unit;
  }
}

TEST(zxsys2, bytes_and_kilobytes_are_units) {
  const FakeDisk disk({100'000, 8, 512});
  EXPECT_EQ(disk_bytes('C'), 409'600'000);
  EXPECT_EQ(disk_kb('d'), 781 * 512);  // 800000 / 1024
  EXPECT_EQ(disk_kb('\0'), 781 * 512);
  EXPECT_TRUE(drive_ok('e'));
  EXPECT_EQ(disk.letters, "Cd0e");
}

TEST(zxsys2, a_unit_of_no_bytes_fails_an_assertion) {
  EXPECT_ASSERTION(diskfree('\0', 0), "zxsys2");
  kit::with_failures_dropped([] { EXPECT_EQ(diskfree('\0', 0), 0); });
}

TEST(zxsys2, the_current_drive_has_space) {
  EXPECT_GT(disk_bytes('\0'), 0);
  EXPECT_GT(disk_kb('C'), 0);
  EXPECT_GT(disk_kb('c'), 0);
  EXPECT_TRUE(drive_ok('C'));
  EXPECT_TRUE(drive_ok('c'));
}

void expect_no_drive(char letter) {
  SCOPED_TRACE(letter);
  const std::function<std::int32_t()> questions[] = {
      [=] { return diskfree(letter, 512); }, [=] { return disk_bytes(letter); },
      [=] { return disk_kb(letter); }};
  for (const auto& question : questions) {
    expect_failure([&] { question(); }, 1028, "diskfree: bad drive", "");
    kit::with_failures_dropped([&] { EXPECT_EQ(question(), 0); });
  }
}

TEST(zxsys2, a_drive_that_there_is_not_is_fatal) {
  expect_no_drive('1');
  expect_no_drive('\\');
  std::error_code ignored;
  if (kit::on_windows() && fs::exists("Q:\\", ignored)) return;
  expect_no_drive('Q');
  expect_no_drive('q');
  EXPECT_FALSE(drive_ok('Q'));
  EXPECT_FALSE(drive_ok('q'));
  EXPECT_FALSE(space_for("Q:\\"));
  EXPECT_FALSE(space_for("q:x"));
  EXPECT_FALSE(make_path("Q:\\new\\folder"));
  EXPECT_FALSE(make_path("q:new"));
}

TEST(zxsys2, a_disk_that_cannot_be_asked_is_no_good_drive) {
  Faults faults;
  faults.fail_all(Call::disk_space, zxplat::k_err_io);
  expect_no_drive('C');
  expect_no_drive('\0');
  EXPECT_FALSE(drive_ok('C'));
  EXPECT_FALSE(space_for("C:\\"));
}

TEST(zxsys2, a_drive_is_asked_for_by_a_letter) {
  for (const char byte : {'\0', '1', '@', '[', '`', '{', '\xe0'}) {
    expect_assertion_at([=] { drive_ok(byte); }, "zxsys2:519");
    kit::with_failures_dropped([=] { EXPECT_FALSE(drive_ok(byte)); });
  }
}

TEST(zxsys2, there_is_space_from_512000_bytes_on) {
  const TempDir folder;
  {
    const FakeDisk disk({999, 1, 512});
    EXPECT_FALSE(space_for(folder.path().c_str()));
  }
  {
    const FakeDisk disk({1000, 1, 512});
    EXPECT_TRUE(space_for(folder.path().c_str()));
  }
  {
    const FakeDisk disk({4'194'304, 8, 512});
    EXPECT_TRUE(space_for(folder.path().c_str()));
  }
  EXPECT_EQ(names_in(folder.path()), Names());
}

TEST(zxsys2, space_is_looked_for_on_the_drive_of_the_path) {
  const FakeDisk disk({1000, 1, 512});
  space_for("x");
  EXPECT_EQ(disk.letters, "0");
  space_for("q:\\none");
  EXPECT_EQ(disk.letters, "0QQ");
}

TEST(zxsys2, space_is_for_files_in_a_directory) {
  const Files files;
  const FakeDisk disk({1000, 1, 512});
  const WorkingIn there(files.folder.path());
  for (const std::string& path :
       {files.folder.path(), std::string("."), files.folder.path() + "\\"})
    EXPECT_TRUE(space_for(path.c_str())) << path;
  for (const std::string& path :
       {files.from, files.missing, std::string("none")})
    EXPECT_FALSE(space_for(path.c_str())) << path;
  Faults faults;
  faults.fail_all(Call::open, zxplat::k_err_denied);
  EXPECT_FALSE(space_for(files.folder.path().c_str()));
  EXPECT_EQ(names_in(files.folder.path()), (Names{"from", "to"}));
}

// ---- the environment

TEST(zxsys2, a_variable_has_its_value_or_none) {
  kit::set_variable("ZX_SYS2_TEST", "a value;");
  EXPECT_EQ(text_of(get_env("ZX_SYS2_TEST")), "a value;");
  kit::set_variable("ZX_SYS2_TEST", nullptr);
  EXPECT_EQ(text_of(get_env("ZX_SYS2_TEST")), "");
  EXPECT_EQ(text_of(get_env("")), "");
}

// ---- standard output

ZX_CASE(zxsys2_redirects) {
  init_zxlib_args(argc, argv);
  std::printf("printf before,");
  std::fflush(stdout);
  oprint("oprint before");
  redirect_stdout(argv[1]);
  oprint("oprint after,");
  g_stdout.flush();
  std::printf("printf after;");
  std::fflush(stdout);
  oprint("at the end.");
  return 0;
}

TEST(zxsys2, standard_output_goes_to_the_end_of_a_file) {
  const TempDir folder;
  const std::string file = folder.file("out");
  const std::string line = "oprint after,printf after;at the end.";
  std::string expected;
  for (int i = 0; i < 2; ++i) {
    const kit::ProcessResult process =
        kit::run_case("zxsys2_redirects", {file});
    EXPECT_EQ(process.exit_code, 0);
    EXPECT_EQ(process.out, "printf before,oprint before");
    EXPECT_EQ(process.err, "");
    expected += line;
    EXPECT_EQ(read_file(file), expected);
  }
}

// Its arguments: the file, the call that is to fail, and whether the failure
// is to be dropped.
ZX_CASE(zxsys2_fails_to_redirect) {
  kit::start();
  Faults faults;
  if (!faults.parse(argv[2])) return 1;
  const auto redirect = [&] { redirect_stdout(argv[1]); };
  if (std::string(argv[3]) == "dropped")
    kit::with_failures_dropped(redirect);
  else
    redirect();
  oprint("and on");
  return 0;
}

struct RedirectRow {
  const char* fault;
  const char* position;
  bool is_redirected;  // by then
};
constexpr RedirectRow k_redirect_rows[] = {{"open:1", "zxsys2:630", false},
                                           {"bind:1", "zxsys2:631", false},
                                           {"close:1", "zxsys2:632", true}};

// What a case printed where it should have, and nothing anywhere else.
std::string printed(const RedirectRow& row, const std::string& end,
                    int exit_code) {
  SCOPED_TRACE(row.fault);
  const TempDir folder;
  const std::string file = folder.file("out");
  write_file(file, "");
  kit::ProcessOptions options;
  options.directory = folder.path();
  const kit::ProcessResult process = kit::run_case(
      "zxsys2_fails_to_redirect", {file, row.fault, end}, options);
  EXPECT_EQ(process.exit_code, exit_code);
  EXPECT_EQ(row.is_redirected ? process.out : read_file(file), "");
  return row.is_redirected ? read_file(file) : process.out;
}

TEST(zxsys2, each_failed_call_of_a_redirection_fails_an_assertion) {
  for (const RedirectRow& row : k_redirect_rows) {
    const std::string text = printed(row, "told", 100);
    const std::string start =
        "\r\np v Fatal Error 1000: bailed out: " + std::string(row.position);
    EXPECT_TRUE(text.starts_with(start)) << text;
  }
}

TEST(zxsys2, behind_a_dropped_failure_standard_output_still_goes_somewhere) {
  for (const RedirectRow& row : k_redirect_rows)
    EXPECT_EQ(printed(row, "dropped", 0), "and on");
}

TEST(zxsys2, standard_output_does_not_go_where_no_file_can_be) {
  const Files files;
  make_read_only(files.to);
  for (const std::string& name :
       {files.to, files.folder.path(), files.in_missing_folder}) {
    expect_assertion_at([&] { redirect_stdout(name.c_str()); }, "zxsys2:630");
    kit::with_failures_dropped([&] { redirect_stdout(name.c_str()); });
  }
  EXPECT_EQ(read_file(files.to), Files::k_to_bytes);
}

}  // namespace
