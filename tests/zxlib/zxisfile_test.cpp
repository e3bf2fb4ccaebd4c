// zxisfile_test.cpp - questions about one file: each letter both ways, what
// counts as binary, what is left behind, and questions about all files of a
// pattern.
// Tests zxlib/zxisfile.h and zxisfile.cpp.
#include "zxisfile.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <random>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include "kit/failure.h"
#include "kit/faults.h"
#include "kit/process.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "zxnextf.h"
#include "zxplat.h"

namespace {

namespace fs = std::filesystem;

using namespace std::string_literals;
using kit::Call;
using kit::Faults;
using kit::make_read_only;
using kit::names_in;
using kit::TempDir;
using kit::WorkingIn;
using kit::write_file;
using Names = std::vector<std::string>;

constexpr std::int32_t k_most = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t k_least = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t k_untouched = -77;

// ---------------------------------------------------------------- helpers --

using kit::str;

bool holds(const std::string& name, const char* tests) {
  return isfile(str(name), tests);
}

// The letters of `letters` that hold for a name.
std::string letters_of(const std::string& name,
                       const std::string& letters = "dfcrwxszBT") {
  std::string held;
  for (const char letter : letters) {
    const char test[] = {letter, '\0'};
    if (holds(name, test)) held += letter;
  }
  return held;
}

// What is told about a name, with the result.
struct Told {
  bool result;
  std::int32_t size = k_untouched;
  std::int32_t time = k_untouched;

  bool operator==(const Told&) const = default;
};

Told told_of(const std::string& name, const char* tests = nullptr) {
  Told told = {};
  told.result = isfile(str(name), tests, &told.size, &told.time);
  return told;
}

// A folder with a file and a folder in it.
struct Place {
  Place() {
    write_file(file, k_bytes);
    write_file(empty, "");
    fs::create_directory(inner);
  }
  static constexpr std::string_view k_bytes = "some text\r\n";

  const TempDir folder;
  const std::string file = folder.file("File.txt");
  const std::string empty = folder.file("empty");
  const std::string inner = folder.file("inner");
  const std::string missing = folder.file("none");
};

// ----------------------------------------------------------- what is there --

TEST(zxisfile, a_name_that_is_there_passes_without_tests) {
  const Place place;
  for (const char* tests : {static_cast<const char*>(nullptr), ""}) {
    EXPECT_TRUE(holds(place.file, tests));
    EXPECT_TRUE(holds(place.empty, tests));
    EXPECT_TRUE(holds(place.inner, tests));
    EXPECT_FALSE(holds(place.missing, tests));
    EXPECT_FALSE(holds(place.missing + "/deeper", tests));
    EXPECT_FALSE(holds(place.file + "/deeper", tests));
    EXPECT_FALSE(holds("", tests));
  }
}

TEST(zxisfile, nothing_holds_for_a_missing_name) {
  const Place place;
  EXPECT_EQ(letters_of(place.missing), "");
  EXPECT_EQ(letters_of(place.missing + "\\"), "");
  EXPECT_EQ(letters_of(""), "");
  EXPECT_EQ(names_in(place.folder.path()),
            (Names{"File.txt", "empty", "inner"}));
}

TEST(zxisfile, names_are_those_of_the_library) {
  const Place place;
  const WorkingIn there(place.folder.path());
  for (const char* name :
       {"File.txt", ".\\File.txt", "./File.txt", "inner\\..\\File.txt",
        "FILE.TXT", "INNER/../file.txt"})
    EXPECT_EQ(letters_of(name, "df"), "f") << name;
}

TEST(zxisfile, a_final_backslash_asks_for_a_directory) {
  const Place place;
  EXPECT_TRUE(holds(place.inner + "\\", nullptr));
  EXPECT_TRUE(holds(place.inner + "\\", "d"));
  EXPECT_TRUE(holds(place.inner + "\\\\", "d"));
  EXPECT_FALSE(holds(place.file + "\\", nullptr));
  EXPECT_FALSE(holds(place.file + "\\", "f"));
  EXPECT_FALSE(holds(place.file + "\\\\", "f"));
  EXPECT_FALSE(holds(place.missing + "\\", nullptr));
}

TEST(zxisfile, roots_are_directories) {
  EXPECT_EQ(letters_of("\\", "dfcsz"), "dz");
  EXPECT_EQ(letters_of("C:\\", "dfcsz"), "dz");
  EXPECT_EQ(letters_of("C:\\\\", "dfcsz"), "dz");
  EXPECT_TRUE(holds("C:", "d"));
  EXPECT_TRUE(holds(".", "d"));
}

TEST(zxisfile, drives_and_servers_that_are_not_there) {
  if (!holds("B:\\", nullptr)) {
    EXPECT_FALSE(holds("B:", nullptr));
    EXPECT_FALSE(holds("B:\\x", nullptr));
  }
  for (const char* name : {"\\\\no-such-server\\share", "\\\\no-such-server",
                           "\\\\no-such-server\\share\\"})
    EXPECT_FALSE(holds(name, nullptr)) << name;
}

TEST(zxisfile, the_null_device_is_not_there) {
  for (const char* name : {"nul", "NUL", "Nul"}) {
    EXPECT_EQ(told_of(name), Told{false}) << name;
    EXPECT_EQ(letters_of(name), "");
  }
}

TEST(zxisfile, a_pipe_is_not_there) {
  if (kit::on_windows()) GTEST_SKIP() << "pipes have no names in folders";
  const TempDir folder;
  const std::string path = folder.file("pipe");
  if (kit::run_process({"mkfifo", path}).exit_code != 0)
    GTEST_SKIP() << "there is no program that makes pipes";
  EXPECT_EQ(told_of(path), Told{false});
  EXPECT_EQ(letters_of(path), "");
}

TEST(zxisfile, a_link_stands_for_what_it_leads_to) {
  const Place place;
  const std::string to_file = place.folder.file("to file");
  const std::string to_folder = place.folder.file("to folder");
  const std::string to_nothing = place.folder.file("to nothing");
  if (!kit::make_link(place.file, to_file) ||
      !kit::make_link(place.inner, to_folder) ||
      !kit::make_link(place.missing, to_nothing))
    GTEST_SKIP() << "a program cannot make links here";
  EXPECT_EQ(letters_of(to_file, "dfcrws"), "frws");
  EXPECT_EQ(letters_of(to_folder, "dfc"), "d");
  EXPECT_TRUE(holds(to_folder + "\\", "d"));
  EXPECT_EQ(told_of(to_nothing), Told{false});
}

// ---------------------------------------------------------- size and time --

std::int32_t seconds_of(const std::string& path) {
  const auto time = std::chrono::file_clock::to_sys(fs::last_write_time(path));
  return static_cast<std::int32_t>(
      std::chrono::floor<std::chrono::seconds>(time)
          .time_since_epoch()
          .count());
}

void set_seconds(const std::string& path, std::int64_t seconds) {
  const std::chrono::sys_seconds time{std::chrono::seconds(seconds)};
  fs::last_write_time(path, std::chrono::file_clock::from_sys(time));
}

TEST(zxisfile, size_and_time_are_told) {
  const Place place;
  set_seconds(place.file, 1'234'567'890);
  set_seconds(place.empty, 1);
  EXPECT_EQ(told_of(place.file), (Told{true, 11, 1'234'567'890}));
  EXPECT_EQ(told_of(place.empty), (Told{true, 0, 1}));
  EXPECT_EQ(file_size(str(place.file)), 11);
  EXPECT_EQ(file_time(str(place.file)), 1'234'567'890);
  EXPECT_EQ(told_of(place.inner), (Told{true, 0, seconds_of(place.inner)}));
  EXPECT_EQ(told_of(place.inner + "\\").size, 0);
}

TEST(zxisfile, each_value_alone_may_be_wanted) {
  const Place place;
  set_seconds(place.file, 1000);
  std::int32_t value = k_untouched;
  EXPECT_TRUE(isfile(str(place.file), "f", &value));
  EXPECT_EQ(value, 11);
  EXPECT_TRUE(isfile(str(place.file), "f", nullptr, &value));
  EXPECT_EQ(value, 1000);
}

TEST(zxisfile, size_and_time_are_told_of_what_then_fails_a_test) {
  const Place place;
  set_seconds(place.file, 1000);
  EXPECT_EQ(told_of(place.file, "d"), (Told{false, 11, 1000}));
  EXPECT_EQ(told_of(place.file, "fz"), (Told{false, 11, 1000}));
  EXPECT_EQ(told_of(place.file + "\\"), (Told{false, 11, 1000}));
}

TEST(zxisfile, nothing_is_told_of_what_is_missing) {
  const Place place;
  for (const std::string& name : {place.missing, ""s, "nul"s}) {
    EXPECT_EQ(told_of(name), Told{false});
    EXPECT_EQ(file_size(str(name)), 0);
    EXPECT_EQ(file_time(str(name)), 0);
  }
}

TEST(zxisfile, sizes_end_at_31_bits) {
  const TempDir folder;
  const std::string path = folder.file("large");
  write_file(path, "");
  for (const std::int64_t size :
       {std::int64_t{k_most} - 1, std::int64_t{k_most},
        std::int64_t{k_most} + 1, std::int64_t{1} << 32,
        (std::int64_t{1} << 32) + 5}) {
    std::error_code error;
    fs::resize_file(path, static_cast<std::uintmax_t>(size), error);
    if (error) GTEST_SKIP() << "no file is that large here";
    EXPECT_EQ(file_size(str(path)), std::min<std::int64_t>(size, k_most));
    EXPECT_EQ(letters_of(path, "sz"), "s") << size;
  }
}

TEST(zxisfile, times_from_before_1970_are_negative) {
  const Place place;
  for (const std::int64_t time : {-86'400, -1, 0, 1, k_most}) {
    set_seconds(place.file, time);
    EXPECT_EQ(told_of(place.file).time, time);
  }
}

TEST(zxisfile, times_end_at_32_bits) {
  if (kit::on_windows()) GTEST_SKIP() << "a test cannot set such times here";
  const Place place;
  for (const std::int64_t more : {1, 100'000'000}) {
    set_seconds(place.file, k_most + more);
    EXPECT_EQ(told_of(place.file).time, k_most);
    EXPECT_EQ(file_time(str(place.file)), k_most);
  }
  // Some file systems end there themselves.
  set_seconds(place.file, std::int64_t{k_least} - 100'000'000);
  EXPECT_EQ(told_of(place.file).time, k_least);
}

// ------------------------------------------------------------ the letters --

TEST(zxisfile, kinds) {
  const Place place;
  EXPECT_EQ(letters_of(place.file, "dfc"), "f");
  EXPECT_EQ(letters_of(place.empty, "dfc"), "f");
  EXPECT_EQ(letters_of(place.inner, "dfc"), "d");
}

TEST(zxisfile, a_character_device) {
  if (kit::on_windows()) GTEST_SKIP() << "devices are shown as files";
  EXPECT_EQ(letters_of("\\dev\\null", "dfcrwszBT"), "crwz");
  EXPECT_EQ(letters_of("/dev/zero", "dfcBT"), "cB");
  EXPECT_FALSE(holds("/dev/null\\", "c"));
}

TEST(zxisfile, sizes) {
  const Place place;
  EXPECT_EQ(letters_of(place.file, "sz"), "s");
  EXPECT_EQ(letters_of(place.empty, "sz"), "z");
  EXPECT_EQ(letters_of(place.inner, "sz"), "z");
}

TEST(zxisfile, a_file_is_readable_if_it_can_be_opened) {
  const Place place;
  EXPECT_TRUE(holds(place.file, "r"));
  EXPECT_FALSE(holds(place.inner, "r"));
  Faults faults;
  faults.fail_nth(Call::open, 1, zxplat::k_err_denied);
  EXPECT_FALSE(holds(place.file, "r"));
  EXPECT_TRUE(holds(place.file, "r"));
  EXPECT_EQ(faults.count(Call::open), 2);
  EXPECT_EQ(faults.count(Call::close), 1);
}

TEST(zxisfile, a_file_is_writable_if_it_can_be_opened_for_it) {
  const Place place;
  EXPECT_TRUE(holds(place.file, "w"));
  EXPECT_TRUE(holds(place.empty, "w"));
  EXPECT_EQ(kit::read_file(place.file), Place::k_bytes);
  make_read_only(place.file);
  EXPECT_FALSE(holds(place.file, "w"));
  EXPECT_TRUE(holds(place.file, "r"));
  EXPECT_EQ(kit::read_file(place.file), Place::k_bytes);
  Faults faults;
  faults.fail_nth(Call::open, 1, zxplat::k_err_sharing);
  EXPECT_FALSE(holds(place.empty, "w"));
}

TEST(zxisfile, the_owners_right_to_execute) {
  if (kit::on_windows()) GTEST_SKIP() << "there are no such rights";
  const Place place;
  EXPECT_FALSE(holds(place.file, "x"));
  fs::permissions(place.file, fs::perms::group_exec | fs::perms::others_exec,
                  fs::perm_options::add);
  EXPECT_FALSE(holds(place.file, "x"));
  fs::permissions(place.file, fs::perms::owner_exec);
  EXPECT_TRUE(holds(place.file, "x"));
  EXPECT_TRUE(holds(place.inner, "x"));
}

TEST(zxisfile, this_program_can_be_executed_and_a_text_cannot) {
  const Place place;
  EXPECT_TRUE(holds(kit::self_path(), "x"));
  EXPECT_TRUE(holds(kit::self_path(), "frsxB"));
  EXPECT_FALSE(holds(place.file, "x"));
}

TEST(zxisfile, all_letters_must_hold) {
  const Place place;
  EXPECT_TRUE(holds(place.file, "frwsT"));
  EXPECT_TRUE(holds(place.file, "Tsfff"));
  EXPECT_FALSE(holds(place.file, "frwszT"));
  EXPECT_FALSE(holds(place.file, "df"));
  EXPECT_FALSE(holds(place.file, "fd"));
  EXPECT_TRUE(holds(place.inner, "dwz"));
}

TEST(zxisfile, the_first_letter_that_fails_ends_the_questions) {
  const Place place;
  const Faults calls;
  EXPECT_FALSE(holds(place.file, "drwBT?"));
  EXPECT_FALSE(holds(place.missing, "?"));
  EXPECT_EQ(calls.count(Call::open), 0);
}

TEST(zxisfile, an_unknown_letter_fails_an_assertion_and_does_not_hold) {
  const Place place;
  const std::string known = "dfcrwxszBT";
  for (int byte = 1; byte < 256; ++byte) {
    const char test[] = {static_cast<char>(byte), '\0'};
    if (known.find(test[0]) != known.npos) continue;
    EXPECT_FAILURE(isfile(place.file.c_str(), test),
                   "1000: bailed out: zxisfile:134 ",
                   "[1000-1000-0/E-0/E/zxisfile:134/]");
    kit::with_failures_dropped([&] { EXPECT_FALSE(holds(place.file, test)); });
  }
  EXPECT_FAILURE(isfile(place.file.c_str(), "fs t"),
                 "1000: bailed out: zxisfile:134 ",
                 "[1000-1000-0/E-0/E/zxisfile:134/]");
}

TEST(zxisfile, three_final_backslashes_fail_an_assertion) {
  const Place place;
  const std::string name = place.inner + "\\\\\\";
  EXPECT_FAILURE(isfile(name.c_str(), nullptr),
                 "1000: bailed out: zxnextf:261 ",
                 "[1000-1000-0/E-0/E/zxnextf:261/]");
  kit::with_failures_dropped([&] { EXPECT_FALSE(holds(name, "f")); });
}

// ---------------------------------------------------------- binary or text --

// What the letters "B" and "T" say of a file with these bytes.
std::string content_of(const std::string& bytes) {
  const TempDir folder;
  const std::string path = folder.file("file");
  write_file(path, bytes);
  return letters_of(path, "BT");
}

std::string run_of(std::size_t count, char byte) {
  return std::string(count, byte);
}

TEST(zxisfile, binary_and_text_worked_out_by_hand) {
  const struct {
    const char* what;
    std::string bytes;
    const char* expected;
  } rows[] = {
      {"nothing", "", ""},
      {"one letter", "a", "T"},
      {"one control byte", "\1", "B"},
      {"a NUL", "\0"s, "B"},
      {"128 control bytes", run_of(128, '\2'), "B"},
      {"128 letters", run_of(128, 'x'), "T"},
      {"blank, tab, line feed, 11, form feed, CR", " \t\n\v\f\r", "T"},
      {"4 plain, 1 odd", "abcd\1", "B"},
      {"5 plain, 1 odd", "abcde\1", "T"},
      {"the same the other way round", "\1abcde", "T"},
      {"20 for a line end, 4 odd", "\r\n\1\1\1\1", "T"},
      {"20 for a line end, 5 odd", "\r\n\1\1\1\1\1", "B"},
      {"LF CR is no line end", "\n\r\1", "B"},
      {"nor is CR alone", "\r\1", "B"},
      {"nor LF alone", "\n\1", "B"},
      {"CR CR LF: 21, 4 odd", "\r\r\n\1\1\1\1", "T"},
      {"CR CR LF: 21, 5 odd", "\r\r\n\1\1\1\1\1", "B"},
      {"two line ends: 40, 8 odd", "\r\n\r\n" + run_of(8, '\1'), "T"},
      {"two line ends: 40, 9 odd", "\r\n\r\n" + run_of(9, '\1'), "B"},
      {"120 control bytes, 4 line ends: 80 against 600",
       run_of(120, '\1') + "\r\n\r\n\r\n\r\n", "B"},
      {"letters of code page 862", "\x80\x8F\x9A\x80\x9A", "T"},
      {"letters of code page 1255", "\xE0\xE1\xFA", "B"},
      {"what stands behind 128 plain bytes",
       run_of(128, 'x') + run_of(1000, '\1'), "T"},
      {"what stands behind 128 odd bytes",
       run_of(128, '\1') + run_of(1000, 'x'), "B"},
      {"106 and 22 odd, a pair cut in two by the limit",
       run_of(22, '\1') + run_of(105, 'x') + "\r\n", "B"},
      {"104, a pair just inside and 22 odd",
       run_of(22, '\1') + run_of(104, 'x') + "\r\n", "T"},
      {"107 and 21 odd", run_of(21, '\1') + run_of(107, 'x'), "T"},
      {"106 and 22 odd", run_of(106, 'x') + run_of(22, '\1'), "B"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(content_of(row.bytes), row.expected) << row.what;
}

TEST(zxisfile, the_bytes_that_do_not_belong_into_text) {
  const auto is_plain = [](int byte) {
    return (byte >= 9 && byte <= 13) || (byte >= 32 && byte <= 126) ||
           (byte >= 128 && byte <= 154);
  };
  for (int byte = 0; byte < 256; ++byte)
    EXPECT_EQ(content_of(std::string(1, static_cast<char>(byte))),
              is_plain(byte) ? "T" : "B")
        << byte;
}

std::string model_of_content(const std::string& bytes) {
  const std::string start = bytes.substr(0, 128);
  if (start.empty()) return "";
  int odd = 0;
  int plain = 0;
  for (std::size_t i = 0; i < start.size();) {
    if (start[i] == '\r' && i + 1 < start.size() && start[i + 1] == '\n') {
      plain += 20;
      i += 2;
      continue;
    }
    const int byte = static_cast<unsigned char>(start[i]);
    const bool is_space = byte == 32 || (byte >= 9 && byte <= 13);
    const bool is_letter_of_862 = byte >= 128 && byte <= 154;
    const int with_sign = byte < 128 ? byte : byte - 256;
    const bool is_odd =
        !is_space && !is_letter_of_862 && (with_sign < 32 || with_sign == 127);
    (is_odd ? odd : plain) += 1;
    i += 1;
  }
  return plain < odd * 5 ? "B" : "T";
}

TEST(zxisfile, random_bytes_are_judged_as_in_the_model) {
  const std::string alphabet = "abc \r\n\n\x1\x7F\x80\xE0\x1F";
  std::mt19937 random(128);
  int texts = 0;
  for (int i = 0; i < 400; ++i) {
    const auto odd_share = random() % 40;
    std::string bytes;
    for (auto count = random() % 150; count > 0; --count) {
      if (random() % 20 == 0)
        bytes += "\r\n";
      else if (random() % 100 < odd_share)
        bytes += '\x1';
      else
        bytes += alphabet[random() % (odd_share % 2 == 0 ? 4 : 12)];
    }
    const std::string expected = model_of_content(bytes);
    if (expected == "T") ++texts;
    EXPECT_EQ(content_of(bytes), expected) << testing::PrintToString(bytes);
  }
  EXPECT_GT(texts, 50);
  EXPECT_LT(texts, 350);
}

TEST(zxisfile, what_cannot_be_read_is_neither_binary_nor_text) {
  const Place place;
  EXPECT_EQ(letters_of(place.inner, "BT"), "");
  {
    Faults faults;
    faults.fail_all(Call::open, zxplat::k_err_sharing);
    EXPECT_EQ(letters_of(place.file, "BT"), "");
  }
  Faults faults;
  faults.fail_all(Call::read);
  EXPECT_EQ(letters_of(place.file, "BT"), "");
  EXPECT_EQ(faults.count(Call::close), 2);
}

// ------------------------------------------------------ writable directories
// --

// Time stands still, so that the names that a question will try are known.
class StillTime {
 public:
  StillTime() {
    zxplat::process.ticks = [] { return std::uint32_t{0}; };
  }
  StillTime(const StillTime&) = delete;
  StillTime& operator=(const StillTime&) = delete;
  ~StillTime() { zxplat::process.ticks = zxplat::system_process.ticks; }
};

// Makes files of the next names that a question in this folder will try.
void take_names(const TempDir& folder, std::uint32_t count) {
  zxStr name;
  EXPECT_TRUE(try_uniqfile(str(folder.path()), "", name));
  const zxStr file = file_part(name);
  const std::string last(file.view());
  const auto number = static_cast<std::uint32_t>(std::stoul(last.substr(3)));
  for (std::uint32_t i = 1; i <= count; ++i) {
    const std::string digits = std::to_string((number + i) % 99'991);
    write_file(folder.file("tmp" + digits + ".tmp"), "taken");
  }
}

TEST(zxisfile, a_directory_is_writable_if_a_file_can_be_made) {
  const TempDir folder;
  const Faults calls;
  for (const std::string ending : {"", "\\", "\\\\", "/"})
    EXPECT_TRUE(holds(folder.path() + ending, "dw")) << ending;
  EXPECT_TRUE(names_in(folder.path()).empty());
  EXPECT_EQ(calls.count(Call::open), 4);
  EXPECT_EQ(calls.count(Call::close), 4);
  EXPECT_EQ(calls.count(Call::remove), 4);
}

TEST(zxisfile, the_working_directory_is_writable) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  EXPECT_TRUE(holds(".", "dw"));
  EXPECT_TRUE(holds(".\\", "dw"));
  EXPECT_TRUE(names_in(folder.path()).empty());
}

TEST(zxisfile, a_directory_in_which_no_file_can_be_made) {
  for (const int error : {zxplat::k_err_denied, zxplat::k_err_write_protected,
                          zxplat::k_err_disk_full}) {
    const TempDir folder;
    Faults faults;
    faults.fail_all(Call::open, error);
    EXPECT_FALSE(holds(folder.path(), "dw"));
    EXPECT_TRUE(holds(folder.path(), "d"));
    EXPECT_EQ(faults.count(Call::open), 1);
    EXPECT_EQ(faults.count(Call::remove), 0);
    EXPECT_TRUE(names_in(folder.path()).empty());
  }
}

TEST(zxisfile, a_question_leaves_no_file_behind_when_closing_it_fails) {
  const TempDir folder;
  Faults faults;
  faults.fail_nth(Call::close, 1, zxplat::k_err_disk_full);
  EXPECT_FALSE(holds(folder.path(), "dw"));
  EXPECT_EQ(faults.count(Call::remove), 1);
  EXPECT_TRUE(names_in(folder.path()).empty());
}

TEST(zxisfile, a_directory_that_keeps_its_files_is_not_writable) {
  const TempDir folder;
  Faults faults;
  faults.fail_all(Call::remove, zxplat::k_err_denied);
  EXPECT_FALSE(holds(folder.path(), "dw"));
  // Only what the system refuses to delete is still there.
  const Names left = names_in(folder.path());
  ASSERT_EQ(left.size(), 1U);
  EXPECT_EQ(fs::file_size(folder.file(left[0])), 0U);
}

TEST(zxisfile, names_that_are_taken_do_not_make_a_directory_unwritable) {
  const TempDir folder;
  const StillTime still;
  take_names(folder, 29);
  const Names before = names_in(folder.path());
  EXPECT_EQ(before.size(), 29U);
  EXPECT_TRUE(holds(folder.path(), "dw"));
  EXPECT_EQ(names_in(folder.path()), before);
}

TEST(zxisfile, thirty_names_that_are_taken_do) {
  const TempDir folder;
  const StillTime still;
  take_names(folder, 30);
  const Names before = names_in(folder.path());
  const Faults calls;
  EXPECT_FALSE(holds(folder.path(), "dw"));
  EXPECT_EQ(calls.count(Call::open), 0);
  EXPECT_EQ(calls.count(Call::remove), 0);
  EXPECT_EQ(names_in(folder.path()), before);
  for (const std::string& name : before)
    EXPECT_EQ(kit::read_file(folder.file(name)), "taken");
}

TEST(zxisfile, a_name_that_another_process_takes_first_is_its_own) {
  const TempDir folder;
  {
    Faults faults;
    faults.fail_nth(Call::open, 1, zxplat::k_err_exists_on_create);
    EXPECT_TRUE(holds(folder.path(), "dw"));
    EXPECT_EQ(faults.count(Call::open), 2);
    EXPECT_EQ(faults.count(Call::remove), 1);
  }
  Faults faults;
  faults.fail_all(Call::open, zxplat::k_err_exists_on_create);
  EXPECT_FALSE(holds(folder.path(), "dw"));
  EXPECT_EQ(faults.count(Call::open), 30);
  EXPECT_EQ(faults.count(Call::remove), 0);
  EXPECT_TRUE(names_in(folder.path()).empty());
}

// Another process makes the file just ahead of the first one that is made
// here.
class Rival {
 public:
  Rival() {
    made.clear();
    zxplat::files.open = [](std::string_view name, zxplat::OpenMode mode) {
      if (made.empty()) {
        made = name;
        const zxplat::Fd fd =
            zxplat::system_files.open(name, zxplat::OpenMode::create_new);
        zxplat::system_files.write(fd, "rival", 5);
        zxplat::system_files.close(fd);
      }
      return zxplat::system_files.open(name, mode);
    };
  }
  Rival(const Rival&) = delete;
  Rival& operator=(const Rival&) = delete;
  ~Rival() { zxplat::files.open = zxplat::system_files.open; }

  static inline std::string made;
};

TEST(zxisfile, a_file_that_appears_in_between_is_neither_cut_nor_deleted) {
  const TempDir folder;
  const Rival rival;
  EXPECT_TRUE(holds(folder.path(), "dw"));
  const Names left = names_in(folder.path());
  ASSERT_EQ(left.size(), 1U);
  EXPECT_TRUE(Rival::made.ends_with(left[0]));
  EXPECT_EQ(kit::read_file(folder.file(left[0])), "rival");
}

TEST(zxisfile, no_failing_system_call_ends_the_process) {
  const Place place;
  const Names before = names_in(place.folder.path());
  for (int i = 0; i < kit::k_calls; ++i) {
    const auto call = static_cast<Call>(i);
    if (call == Call::remove) continue;
    SCOPED_TRACE(kit::name_of(call));
    Faults faults;
    faults.fail_all(call);
    const kit::Failure failure = kit::failure_of([&] {
      for (const std::string& name :
           {place.file, place.empty, place.inner, place.folder.path()})
        letters_of(name);
    });
    EXPECT_FALSE(failure.failed) << failure.message;
    EXPECT_EQ(names_in(place.folder.path()), before);
    EXPECT_TRUE(names_in(place.inner).empty());
  }
}

// ------------------------------------------------------ all files of a walk --

TEST(zxisfile, some_or_all_files_of_a_pattern_pass) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a.txt", "x");
  write_file("b.txt", "");
  write_file("full.c", "x");
  fs::create_directories("sub/deep");
  write_file("sub/a.txt", "x");
  write_file("sub/deep/A.TXT", "x");
  const struct {
    const char* pattern;
    const char* tests;
    bool any;
    bool all;
  } rows[] = {
      {"*.txt", "s", true, false},
      {"*.txt", "z", true, false},
      {"*.txt", "f", true, true},
      {"*.txt", "d", false, false},
      {"*.txt", nullptr, true, true},
      {"*.txt", "", true, true},
      {"*.c", "s", true, true},
      {"*.c", "z", false, false},
      {"*.none", "s", false, true},
      {"*.none", nullptr, false, true},
      {"", "f", false, true},
      {"sub\\*", "d", false, false},
      {".\\\\a.txt", "s", true, true},
      {".\\\\*", "s", true, false},
      {"sub\\\\*", "fs", true, true},
      {"sub", "d", true, true},
      {"a.txt", "s", true, true},
      {"a.txt", "z", false, false},
      {"none.txt", nullptr, false, false},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message()
                 << row.pattern << ' ' << (row.tests ? row.tests : "null"));
    EXPECT_EQ(any_file(row.pattern, row.tests), row.any);
    EXPECT_EQ(all_files(row.pattern, row.tests), row.all);
  }
}

TEST(zxisfile, the_first_file_that_decides_ends_the_walk) {
  const TempDir folder;
  for (const char* name : {"a", "b", "c"}) write_file(folder.file(name), "x");
  const zxStr pattern = str(folder.path() + "\\*");
  {
    const Faults calls;
    EXPECT_TRUE(any_file(pattern, "r"));
    EXPECT_EQ(calls.count(Call::open), 1);
  }
  Faults faults;
  EXPECT_TRUE(all_files(pattern, "r"));
  EXPECT_EQ(faults.count(Call::open), 3);
  faults.fail_nth(Call::open, 2);
  EXPECT_FALSE(all_files(pattern, "r"));
  EXPECT_EQ(faults.count(Call::open), 5);
}

}  // namespace
