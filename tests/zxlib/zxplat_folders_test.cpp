// zxplat_folders_test.cpp - tests of what zxlib/zxplat.h has on folders, their
// entries, the status of names and the disk, that is of
// zxplat_posix_folders.cpp or zxplat_win32_folders.cpp, and of the spellings
// that zxplat_posix_names.cpp remembers.

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include "kit/process.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "zxplat.h"

namespace {

namespace fs = std::filesystem;

using kit::TempDir;
using kit::WorkingIn;
using zxplat::Fd;
using zxplat::files;
using zxplat::FileStatus;
using zxplat::FolderEntry;
using zxplat::FolderReader;
using zxplat::k_no_fd;
using zxplat::last_error;
using zxplat::NameKind;
using zxplat::OpenMode;
using zxplat::set_last_error;
using zxplat::Whence;
using Names = std::vector<std::string>;

// No call under test makes this one up.
constexpr int k_untouched = 1234;
constexpr int k_not_empty = 145;

std::string in_capitals(std::string name) {
  for (char& c : name) {
    if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
  }
  return name;
}

// The names in a folder as the system spells them, sorted.
Names spellings_in(const std::string& folder) {
  Names names;
  for (const auto& entry : fs::directory_iterator(folder))
    names.push_back(entry.path().filename().string());
  std::sort(names.begin(), names.end());
  return names;
}

// That a call succeeds and leaves the last error alone.
void expect_success(bool (*call)(std::string_view), const std::string& name) {
  set_last_error(k_untouched);
  EXPECT_TRUE(call(name)) << name << ": " << last_error();
  EXPECT_EQ(last_error(), k_untouched) << name;
}

void expect_failure(bool (*call)(std::string_view), const std::string& name,
                    int number) {
  set_last_error(k_untouched);
  EXPECT_FALSE(call(name)) << name;
  EXPECT_EQ(last_error(), number) << name;
}

// -------------------------------------------------------------- entries --

// What a reader told of an entry: "d" for a folder, "f" for the rest, and
// "l" behind it for a link.
using Entries = std::map<std::string, std::string>;

// All entries of a folder; that one comes twice is a failure.
Entries entries_of(const std::string& folder) {
  Entries entries;
  FolderReader reader(folder);
  for (FolderEntry entry; reader.next(entry);) {
    const std::string kind =
        std::string(entry.is_folder ? "d" : "f") + (entry.is_link ? "l" : "");
    EXPECT_TRUE(entries.emplace(std::string(entry.name), kind).second)
        << entry.name << " came twice";
  }
  FolderEntry more;
  EXPECT_FALSE(reader.next(more)) << "there was an end before";
  return entries;
}

TEST(zxplat_folders,
     a_reader_tells_files_from_folders_and_leaves_out_the_dots) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "bytes");
  kit::write_file(dir.file(".hidden"), "");
  fs::create_directories(dir.file("folder/inner"));
  kit::write_file(dir.file("folder/deep"), "");
  set_last_error(k_untouched);
  EXPECT_EQ(entries_of(dir.path()),
            (Entries{{"file", "f"}, {".hidden", "f"}, {"folder", "d"}}));
  EXPECT_EQ(last_error(), k_untouched);
}

TEST(zxplat_folders, a_folder_is_read_under_each_of_its_names) {
  const TempDir dir;
  fs::create_directory(dir.file("Folder"));
  kit::write_file(dir.file("Folder/file"), "");
  const Entries expected = {{"file", "f"}};
  const WorkingIn there(dir.path());
  for (const std::string& name :
       {dir.path() + "\\Folder", dir.path() + "/Folder/",
        dir.path() + "\\FOLDER\\", std::string("Folder"),
        std::string(".\\folder"), std::string("folder\\..\\folder\\.")}) {
    EXPECT_EQ(entries_of(name), expected) << name;
  }
}

TEST(zxplat_folders, an_empty_name_is_the_working_directory) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  const WorkingIn there(dir.path());
  EXPECT_EQ(entries_of(""), (Entries{{"file", "f"}}));
  EXPECT_EQ(entries_of("."), (Entries{{"file", "f"}}));
  if (!kit::on_windows()) {
    EXPECT_EQ(entries_of("c:"), (Entries{{"file", "f"}}));
  }
}

TEST(zxplat_folders, an_empty_folder_has_no_entries_and_is_no_failure) {
  const TempDir dir;
  set_last_error(k_untouched);
  EXPECT_EQ(entries_of(dir.path()), Entries());
  EXPECT_EQ(last_error(), k_untouched);
}

void expect_unreadable(const std::string& name, int number) {
  set_last_error(k_untouched);
  EXPECT_EQ(entries_of(name), Entries()) << name;
  EXPECT_EQ(last_error(), number) << name;
}

TEST(zxplat_folders, what_is_no_folder_has_no_entries_and_a_reason) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  // Windows looks for the entries, and the folder is but on the way there.
  expect_unreadable(dir.file("none"), kit::on_windows()
                                          ? zxplat::k_err_path_not_found
                                          : zxplat::k_err_not_found);
  expect_unreadable(dir.file("none/none"), zxplat::k_err_path_not_found);
  expect_unreadable("nul", zxplat::k_err_not_found);
  expect_unreadable(std::string("a\0b", 3), zxplat::k_err_bad_name);
  expect_unreadable(std::string(zxplat::k_max_name + 1, 'a'),
                    zxplat::k_err_bad_name);
}

// What Windows says of it differs from system to system.
TEST(zxplat_folders, a_file_has_no_entries_and_that_is_a_failure) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  set_last_error(k_untouched);
  EXPECT_EQ(entries_of(dir.file("file")), Entries());
  EXPECT_NE(last_error(), k_untouched);
  if (!kit::on_windows()) {
    EXPECT_EQ(last_error(), zxplat::k_err_path_not_found);
  }
}

TEST(zxplat_folders, each_of_thousands_of_entries_comes_once) {
  const TempDir dir;
  Entries expected;
  for (int i = 0; i < 5000; ++i) {
    const std::string name = "entry-" + std::to_string(i);
    kit::write_file(dir.file(name), "");
    expected[name] = "f";
  }
  EXPECT_TRUE(entries_of(dir.path()) == expected);
}

TEST(zxplat_folders, two_readers_of_one_folder_do_not_disturb_each_other) {
  const TempDir dir;
  for (const char* name : {"a", "b", "c"}) kit::write_file(dir.file(name), "");
  FolderReader outer(dir.path());
  Names names;
  for (FolderEntry entry; outer.next(entry);) {
    const std::string name(entry.name);
    EXPECT_EQ(entries_of(dir.path()).size(), 3u);
    EXPECT_EQ(std::string(entry.name), name);
    names.push_back(name);
  }
  std::sort(names.begin(), names.end());
  EXPECT_EQ(names, (Names{"a", "b", "c"}));
}

TEST(zxplat_folders, links_are_told_and_followed_to_their_kind) {
  const TempDir dir;
  fs::create_directory(dir.file("folder"));
  kit::write_file(dir.file("file"), "");
  if (!kit::make_link("folder", dir.file("to-folder")) ||
      !kit::make_link("file", dir.file("to-file")) ||
      !kit::make_link("nowhere", dir.file("to-nothing"))) {
    GTEST_SKIP() << "no links here";
  }
  EXPECT_EQ(entries_of(dir.path()), (Entries{{"folder", "d"},
                                             {"file", "f"},
                                             {"to-folder", "dl"},
                                             {"to-file", "fl"},
                                             {"to-nothing", "fl"}}));
}

TEST(zxplat_folders, names_that_are_no_names_here_are_left_out_natively) {
  if (kit::on_windows()) GTEST_SKIP() << "the system has no such names";
  const TempDir dir;
  for (const char* name :
       {"star*", "quest?on", "back\\slash", "col:on", "quo\"te", "less<",
        "more>", "bar|", "nul", "NUL", "nUl", "prn", "Prn", "LPT1", "lpt1"})
    kit::write_file(dir.path() + "/" + name, "");
  const Entries usable = {{"nul.txt", "f"}, {"lpt2", "f"}, {"a b", "f"},
                          {"~", "f"},       {"-", "f"},    {"...", "f"},
                          {"\xe0\xfa", "f"}};
  for (const auto& entry : usable) kit::write_file(dir.file(entry.first), "");
  EXPECT_EQ(entries_of(dir.path()), usable);
}

TEST(zxplat_folders, the_longest_names_come_whole) {
  if (kit::on_windows()) GTEST_SKIP() << "paths are short here";
  const TempDir dir;
  Entries expected;
  for (const char letter : {'a', 'b', 'c'}) {
    const std::string name(255, letter);
    kit::write_file(dir.file(name), "");
    expected[name] = "f";
  }
  EXPECT_EQ(entries_of(dir.path()), expected);
}

TEST(zxplat_folders, a_reader_gives_its_folder_back) {
  const TempDir dir;
  const kit::FewFiles few(400);  // other tests hold some
  for (int i = 0; i < 500; ++i) {
    set_last_error(k_untouched);
    FolderReader reader(dir.path());
    FolderEntry entry;
    EXPECT_FALSE(reader.next(entry));
    ASSERT_EQ(last_error(), k_untouched) << i;
  }
}

// -------------------------------------------------------------- folders --

TEST(zxplat_folders, a_folder_is_made_as_spelled) {
  const TempDir dir;
  expect_success(files.make_folder, dir.file("Aa"));
  expect_success(files.make_folder, dir.path() + "\\AA\\Bb");
  expect_success(files.make_folder, dir.path() + "/aa/Cc/");
  EXPECT_EQ(spellings_in(dir.path()), (Names{"Aa"}));
  EXPECT_EQ(spellings_in(dir.file("Aa")), (Names{"Bb", "Cc"}));
  EXPECT_TRUE(fs::is_directory(dir.file("Aa/Bb")));
}

TEST(zxplat_folders, a_taken_name_makes_no_folder) {
  const TempDir dir;
  kit::write_file(dir.file("File"), "kept");
  fs::create_directory(dir.file("Folder"));
  for (const char* name : {"File", "FILE", "Folder", "folder"})
    expect_failure(files.make_folder, dir.file(name), zxplat::k_err_exists);
  EXPECT_EQ(spellings_in(dir.path()), (Names{"File", "Folder"}));
  EXPECT_EQ(kit::read_file(dir.file("File")), "kept");
}

TEST(zxplat_folders, a_link_that_leads_nowhere_takes_its_name) {
  const TempDir dir;
  if (!kit::make_link("nowhere", dir.file("Link")))
    GTEST_SKIP() << "no links here";
  expect_failure(files.make_folder, dir.file("Link"), zxplat::k_err_exists);
  expect_failure(files.make_folder, dir.file("LINK"), zxplat::k_err_exists);
}

TEST(zxplat_folders, no_folder_is_made_in_what_is_none) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  expect_failure(files.make_folder, dir.file("none/new"),
                 zxplat::k_err_path_not_found);
  expect_failure(files.make_folder, dir.file("file/new"),
                 zxplat::k_err_path_not_found);
  expect_failure(files.make_folder, "", zxplat::k_err_path_not_found);
  EXPECT_EQ(spellings_in(dir.path()), Names{"file"});
}

TEST(zxplat_folders, an_empty_folder_is_deleted_in_any_spelling) {
  const TempDir dir;
  for (const char* name : {"Aa", "Bb", "Cc"})
    fs::create_directory(dir.file(name));
  expect_success(files.remove_folder, dir.file("Aa"));
  expect_success(files.remove_folder, dir.path() + "\\bB");
  expect_success(files.remove_folder, dir.path() + "/CC/");
  EXPECT_EQ(spellings_in(dir.path()), Names());
}

TEST(zxplat_folders, a_folder_with_something_in_it_stays) {
  const TempDir dir;
  fs::create_directories(dir.file("with-folder/inner"));
  fs::create_directory(dir.file("with-file"));
  kit::write_file(dir.file("with-file/file"), "");
  expect_failure(files.remove_folder, dir.file("with-folder"), k_not_empty);
  expect_failure(files.remove_folder, dir.file("WITH-file"), k_not_empty);
  EXPECT_EQ(spellings_in(dir.path()), (Names{"with-file", "with-folder"}));
}

TEST(zxplat_folders, what_is_no_folder_is_not_deleted_as_one) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  expect_failure(files.remove_folder, dir.file("file"),
                 zxplat::k_err_path_not_found);
  expect_failure(files.remove_folder, dir.file("none"),
                 zxplat::k_err_not_found);
  expect_failure(files.remove_folder, dir.file("none/none"),
                 zxplat::k_err_path_not_found);
  expect_failure(files.remove_folder, "", zxplat::k_err_path_not_found);
  EXPECT_EQ(spellings_in(dir.path()), Names{"file"});
}

TEST(zxplat_folders, a_link_to_a_folder_is_not_deleted_as_one_natively) {
  const TempDir dir;
  fs::create_directory(dir.file("folder"));
  if (kit::on_windows() || !kit::make_link("folder", dir.file("link")))
    GTEST_SKIP() << "no links here";
  expect_failure(files.remove_folder, dir.file("link"),
                 zxplat::k_err_path_not_found);
  EXPECT_EQ(spellings_in(dir.path()), (Names{"folder", "link"}));
}

// ------------------------------------------------ the working directory --

bool stands_in(const std::string& folder) {
  return fs::equivalent(fs::current_path(), folder);
}

TEST(zxplat_folders, the_working_directory_changes_to_any_name_of_a_folder) {
  const TempDir dir;
  fs::create_directories(dir.file("Folder/Inner"));
  const std::string inner = dir.file("Folder/Inner");
  const WorkingIn there(dir.path());
  for (const std::string& name :
       {inner, dir.path() + "\\folder\\inner\\", std::string("FOLDER/INNER"),
        std::string(".\\Folder\\..\\folder\\inner")}) {
    fs::current_path(dir.path());
    expect_success(zxplat::set_current_directory, name);
    EXPECT_TRUE(stands_in(inner)) << name;
  }
  expect_success(zxplat::set_current_directory, "..");
  EXPECT_TRUE(stands_in(dir.file("Folder")));
  expect_success(zxplat::set_current_directory, ".");
  EXPECT_TRUE(stands_in(dir.file("Folder")));
  expect_success(zxplat::set_current_directory, "\\");
  EXPECT_TRUE(stands_in(fs::current_path().root_path().string()));
}

TEST(zxplat_folders, a_folder_that_is_not_there_is_not_changed_to) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  const WorkingIn there(dir.path());
  expect_failure(zxplat::set_current_directory, "none",
                 zxplat::k_err_not_found);
  expect_failure(zxplat::set_current_directory, "none\\none",
                 zxplat::k_err_path_not_found);
  expect_failure(zxplat::set_current_directory, "file",
                 zxplat::k_err_path_not_found);
  expect_failure(zxplat::set_current_directory, "",
                 zxplat::k_err_path_not_found);
  EXPECT_TRUE(stands_in(dir.path()));
}

// --------------------------------------------------------------- status --

// The library counts seconds since 1970-01-01 00:00 UTC.
void set_modified(const std::string& path, std::int64_t seconds,
                  std::chrono::milliseconds more = {}) {
  const std::chrono::sys_seconds time{std::chrono::seconds(seconds)};
  fs::last_write_time(path, std::chrono::file_clock::from_sys(time) + more);
}

FileStatus status_of(const std::string& name) {
  set_last_error(k_untouched);
  const FileStatus status = zxplat::status_of(name);
  EXPECT_EQ(last_error() == k_untouched, status.kind != NameKind::missing);
  return status;
}

TEST(zxplat_folders, the_status_of_a_file_is_its_kind_size_and_time) {
  const TempDir dir;
  kit::write_file(dir.file("File"), "12345");
  set_modified(dir.file("File"), 1'000'000'000);
  const WorkingIn there(dir.path());
  for (const std::string& name :
       {dir.file("File"), dir.path() + "\\FILE", std::string("file")}) {
    const FileStatus status = status_of(name);
    EXPECT_EQ(status.kind, NameKind::file) << name;
    EXPECT_EQ(status.size, 5) << name;
    EXPECT_EQ(status.modified, 1'000'000'000) << name;
    EXPECT_FALSE(status.is_executable) << name;
  }
}

TEST(zxplat_folders, the_status_of_an_empty_file_has_a_size_of_0) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  EXPECT_EQ(status_of(dir.file("file")).kind, NameKind::file);
  EXPECT_EQ(status_of(dir.file("file")).size, 0);
}

TEST(zxplat_folders, times_are_seconds_since_1970) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  for (const std::int64_t time : {0, 1, 0x12345678, 0x7FFFFFFF}) {
    set_modified(dir.file("file"), time);
    EXPECT_EQ(status_of(dir.file("file")).modified, time);
  }
}

TEST(zxplat_folders, times_are_whole_seconds_that_have_passed) {
  if (kit::on_windows()) GTEST_SKIP() << "tests can set no such times";
  const TempDir dir;
  kit::write_file(dir.file("file"), "");
  for (const std::int64_t time :
       {std::int64_t{0}, std::int64_t{4'000'000'000}, std::int64_t{-86'400}}) {
    set_modified(dir.file("file"), time, std::chrono::milliseconds(999));
    EXPECT_EQ(status_of(dir.file("file")).modified, time);
  }
}

TEST(zxplat_folders, the_status_of_a_folder_has_no_size) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "12345");
  for (const char* ending : {"", "\\", "/"}) {
    const FileStatus status = status_of(dir.path() + ending);
    EXPECT_EQ(status.kind, NameKind::directory);
    EXPECT_EQ(status.size, 0);
  }
  EXPECT_TRUE(status_of(dir.path()).is_executable);
}

TEST(zxplat_folders, the_time_of_a_folder_is_that_of_its_last_change) {
  const TempDir dir;
  const std::int64_t before = zxplat::process.clock();
  kit::write_file(dir.file("file"), "");
  const std::int64_t after = zxplat::process.clock();
  const std::int64_t time = status_of(dir.path()).modified;
  EXPECT_GE(time, before - 1);  // the file system's clock lags behind
  EXPECT_LE(time, after);
}

void expect_missing(const std::string& name, int number) {
  const FileStatus status = status_of(name);
  EXPECT_EQ(last_error(), number) << name;
  EXPECT_EQ(status.kind, NameKind::missing) << name;
  EXPECT_EQ(status.size, 0) << name;
  EXPECT_EQ(status.modified, 0) << name;
  EXPECT_FALSE(status.is_executable) << name;
}

TEST(zxplat_folders, the_status_of_what_is_missing_is_nothing_and_a_reason) {
  const TempDir dir;
  expect_missing(dir.file("none"), zxplat::k_err_not_found);
  expect_missing(dir.file("none/none"), zxplat::k_err_path_not_found);
  expect_missing("", zxplat::k_err_path_not_found);
  expect_missing("nul", zxplat::k_err_not_found);
}

TEST(zxplat_folders, devices_and_pipes_are_kinds_of_their_own_natively) {
  if (kit::on_windows()) GTEST_SKIP() << "they have no names here";
  const TempDir dir;
  const std::string pipe = dir.file("pipe");
  ASSERT_EQ(kit::run_process({"mkfifo", pipe}).exit_code, 0);
  EXPECT_EQ(status_of(pipe).kind, NameKind::other);
  EXPECT_EQ(status_of(pipe).size, 0);
  EXPECT_EQ(status_of("\\dev\\null").kind, NameKind::device);
  EXPECT_EQ(status_of("\\dev\\null").size, 0);
}

TEST(zxplat_folders, the_status_of_a_link_is_that_of_its_target) {
  const TempDir dir;
  kit::write_file(dir.file("file"), "12345");
  set_modified(dir.file("file"), 1'000'000'000);
  if (!kit::make_link("file", dir.file("link")) ||
      !kit::make_link("nowhere", dir.file("loose")))
    GTEST_SKIP() << "no links here";
  EXPECT_EQ(status_of(dir.file("link")).kind, NameKind::file);
  EXPECT_EQ(status_of(dir.file("link")).size, 5);
  EXPECT_EQ(status_of(dir.file("link")).modified, 1'000'000'000);
  expect_missing(dir.file("loose"), zxplat::k_err_not_found);
}

TEST(zxplat_folders, sizes_go_beyond_32_bits) {
  const TempDir dir;
  constexpr std::int64_t k_size = 5'000'000'001;
  const Fd fd = files.open(dir.file("large"), OpenMode::create);
  ASSERT_NE(fd, k_no_fd);
  const bool is_large = files.set_size(fd, k_size);
  EXPECT_TRUE(files.close(fd));
  if (!is_large) GTEST_SKIP() << "the file system has no such sizes";
  EXPECT_EQ(status_of(dir.file("large")).size, k_size);
}

TEST(zxplat_folders, what_its_owner_may_execute_is_executable) {
  const TempDir dir;
  // Natively the permission counts, on Windows the ending of the name.
  const std::string program = dir.file("program.exe");
  const std::string others = dir.file("others.txt");
  kit::write_file(program, "");
  kit::write_file(others, "");
  if (!kit::on_windows()) {
    EXPECT_FALSE(status_of(program).is_executable);
  }
  fs::permissions(program, fs::perms::owner_exec, fs::perm_options::add);
  fs::permissions(others, fs::perms::group_exec | fs::perms::others_exec,
                  fs::perm_options::add);
  EXPECT_TRUE(status_of(program).is_executable);
  EXPECT_FALSE(status_of(others).is_executable);
}

// ---------------------------------------------------------------- disks --

TEST(zxplat_folders, the_native_volume_is_the_one_drive) {
  if (kit::on_windows()) GTEST_SKIP() << "the system has its own drives";
  for (const char* name : {"C:", "c:", "C:\\", "c:/"})
    EXPECT_TRUE(zxplat::is_volume(name)) << name;
  for (const char* name : {"", "\\", "D:", "D:\\", "C", "C:x", "C:\\x",
                           "C:\\\\", "1:", ":", "\\\\server\\share\\"})
    EXPECT_FALSE(zxplat::is_volume(name)) << name;
}

TEST(zxplat_folders, the_root_of_a_drive_is_a_volume_and_a_folder_is_none) {
  const TempDir dir;
  EXPECT_TRUE(zxplat::is_volume("C:\\"));
  EXPECT_FALSE(zxplat::is_volume(dir.path() + "\\"));
  EXPECT_FALSE(zxplat::is_volume(dir.path()));
  EXPECT_FALSE(zxplat::is_volume(""));
}

zxplat::DiskSpace space_of(char letter) {
  zxplat::DiskSpace space = {};
  set_last_error(k_untouched);
  EXPECT_TRUE(files.disk_space(letter, space)) << letter << ' ' << last_error();
  EXPECT_EQ(last_error(), k_untouched);
  return space;
}

std::uint64_t bytes_of(const zxplat::DiskSpace& space) {
  return space.free_clusters * space.sectors_per_cluster *
         space.bytes_per_sector;
}

// Others write to the disk meanwhile.
constexpr std::uint64_t k_written_meanwhile = std::uint64_t{256} << 20;

TEST(zxplat_folders, the_room_on_the_current_drive_is_what_a_caller_may_use) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  const std::uint64_t expected = fs::space(".").available;
  const std::uint64_t told = bytes_of(space_of('\0'));
  if (kit::on_windows()) {
    EXPECT_GT(told, 0u);
  } else {
    EXPECT_NEAR(static_cast<double>(told), static_cast<double>(expected),
                static_cast<double>(k_written_meanwhile));
  }
}

TEST(zxplat_folders, a_drive_is_asked_in_either_case) {
  for (const char letter : {'C', 'c'}) {
    const zxplat::DiskSpace space = space_of(letter);
    EXPECT_GT(bytes_of(space), 0u);
    EXPECT_EQ(space.bytes_per_sector, 512u);
  }
}

TEST(zxplat_folders, the_room_is_that_of_the_disk_below_the_working_directory) {
  const std::string other = kit::other_device_folder();
  if (kit::on_windows() || other.empty()) GTEST_SKIP() << "no second device";
  const WorkingIn there(other);
  EXPECT_NEAR(static_cast<double>(bytes_of(space_of('C'))),
              static_cast<double>(fs::space(other).available),
              static_cast<double>(k_written_meanwhile));
}

TEST(zxplat_folders, a_drive_that_there_is_not_has_no_room) {
  for (const char letter : {'Q', '1', '\\', ' ', '\xe0'}) {
    const std::string root = std::string(1, letter) + ":\\";
    std::error_code ignored;
    if (kit::on_windows() && fs::exists(root, ignored)) continue;
    zxplat::DiskSpace space;
    set_last_error(k_untouched);
    EXPECT_FALSE(files.disk_space(letter, space)) << letter;
    EXPECT_EQ(last_error(), zxplat::k_err_path_not_found) << letter;
  }
}

// -------------------------------------------------------------- binding --

std::string read_all(Fd fd) {
  char bytes[300];
  EXPECT_EQ(files.seek(fd, 0, Whence::start), 0);
  const std::int64_t got = files.read(fd, bytes, sizeof bytes);
  return std::string(bytes,
                     static_cast<std::size_t>(std::max<std::int64_t>(got, 0)));
}

TEST(zxplat_folders, a_bound_descriptor_stands_for_the_other_file) {
  const TempDir dir;
  const Fd from = files.open(dir.file("from"), OpenMode::read_append);
  const Fd to = files.open(dir.file("to"), OpenMode::create);
  ASSERT_NE(from, k_no_fd);
  ASSERT_NE(to, k_no_fd);
  EXPECT_EQ(files.write(to, "before", 6), 6);
  set_last_error(k_untouched);
  EXPECT_TRUE(files.bind(from, to));
  EXPECT_EQ(last_error(), k_untouched);
  EXPECT_EQ(files.write(to, "one\n", 4), 4);
  EXPECT_EQ(files.write(from, "two", 3), 3);
  EXPECT_EQ(read_all(from), "one\ntwo");
  EXPECT_TRUE(files.close(from));
  EXPECT_EQ(files.write(to, "three", 5), 5);
  EXPECT_TRUE(files.close(to));
  EXPECT_EQ(kit::read_file(dir.file("from")), "one\ntwothree");
  EXPECT_EQ(kit::read_file(dir.file("to")), "before");
}

TEST(zxplat_folders, what_is_not_open_cannot_be_bound) {
  const TempDir dir;
  const Fd to = files.open(dir.file("to"), OpenMode::create);
  const Fd closed = files.open(dir.file("closed"), OpenMode::create);
  EXPECT_TRUE(files.close(closed));
  for (const Fd from : {closed, k_no_fd}) {
    set_last_error(k_untouched);
    EXPECT_FALSE(files.bind(from, to));
    EXPECT_EQ(last_error(), zxplat::k_err_bad_handle);
  }
  EXPECT_EQ(files.write(to, "still", 5), 5);
  EXPECT_TRUE(files.close(to));
  EXPECT_EQ(kit::read_file(dir.file("to")), "still");
}

// ------------------------------------------------- remembered spellings --

// Folders that each hold a file "file" with their own name in it.
class Spellings {
 public:
  void make(const std::string& folder) const {
    fs::create_directory(dir.file(folder));
    kit::write_file(dir.file(folder + "/file"), folder);
  }

  // What the file of this name says; "-" if there is none.
  std::string read(const std::string& name) const {
    const Fd fd = files.open(dir.file(name), OpenMode::read);
    if (fd == k_no_fd) return "-";
    const std::string text = read_all(fd);
    files.close(fd);
    return text;
  }

  const TempDir dir;
};

constexpr char k_folds[] = "the system itself knows no letter case";

TEST(zxplat_folders, an_exact_spelling_that_comes_later_wins) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  on_disk.make("Data");
  EXPECT_EQ(on_disk.read("data/file"), "Data");
  EXPECT_EQ(on_disk.read("data/FILE"), "Data");
  on_disk.make("data");
  EXPECT_EQ(on_disk.read("data/file"), "data");
  EXPECT_EQ(on_disk.read("data/FILE"), "data");
  EXPECT_EQ(on_disk.read("Data/file"), "Data");
}

TEST(zxplat_folders, capitals_that_come_later_win) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  on_disk.make("Data");
  EXPECT_EQ(on_disk.read("data/file"), "Data");
  on_disk.make("DATA");
  EXPECT_EQ(on_disk.read("data/file"), "DATA");
}

TEST(zxplat_folders, capitals_come_ahead_of_other_spellings) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  for (const char* name : {"dATA", "Data", "DATA", "DATa"}) on_disk.make(name);
  EXPECT_EQ(on_disk.read("data/file"), "DATA");
  EXPECT_EQ(on_disk.read("dAtA/file"), "DATA");
  EXPECT_EQ(on_disk.read("dATA/FiLe"), "dATA");
}

TEST(zxplat_folders, a_deleted_folder_is_not_believed_in) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  on_disk.make("Data");
  EXPECT_EQ(on_disk.read("data/file"), "Data");
  fs::remove_all(on_disk.dir.file("Data"));
  EXPECT_EQ(on_disk.read("data/file"), "-");
  EXPECT_EQ(last_error(), zxplat::k_err_path_not_found);
  on_disk.make("dATa");
  EXPECT_EQ(on_disk.read("data/file"), "dATa");
}

TEST(zxplat_folders, a_renamed_folder_is_found_again) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  on_disk.make("Data");
  EXPECT_EQ(on_disk.read("data/file"), "Data");
  fs::rename(on_disk.dir.file("Data"), on_disk.dir.file("DaTa"));
  EXPECT_EQ(on_disk.read("data/file"), "Data");  // by the text in the file
  fs::rename(on_disk.dir.file("DaTa/file"), on_disk.dir.file("DaTa/File"));
  EXPECT_EQ(on_disk.read("data/file"), "Data");
  fs::rename(on_disk.dir.file("DaTa"), on_disk.dir.file("other"));
  EXPECT_EQ(on_disk.read("data/file"), "-");
}

TEST(zxplat_folders, names_that_begin_alike_are_not_mixed_up) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  on_disk.make("Data");
  on_disk.make("Data2");
  on_disk.make("Dat");
  EXPECT_EQ(on_disk.read("data2/file"), "Data2");
  EXPECT_EQ(on_disk.read("data/file"), "Data");
  EXPECT_EQ(on_disk.read("dat/file"), "Dat");
  EXPECT_EQ(on_disk.read("data/file"), "Data");
  EXPECT_EQ(on_disk.read("data2/file"), "Data2");
  for (const char* name : {"dIsk2", "DIsk", "dIsk"}) on_disk.make(name);
  EXPECT_EQ(on_disk.read("disk2/file"), "dIsk2");
  EXPECT_EQ(on_disk.read("disk/file"), "DIsk");  // the first in byte order
}

TEST(zxplat_folders, each_folder_of_a_chain_is_found) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  fs::create_directories(on_disk.dir.file("Aa/Bb/Cc"));
  kit::write_file(on_disk.dir.file("Aa/Bb/Cc/one"), "one");
  kit::write_file(on_disk.dir.file("Aa/Bb/two"), "two");
  fs::create_directories(on_disk.dir.file("Aa/bB2"));
  kit::write_file(on_disk.dir.file("Aa/bB2/three"), "three");
  for (int round = 0; round < 2; ++round) {
    EXPECT_EQ(on_disk.read("aA/bB/cC/one"), "one");
    EXPECT_EQ(on_disk.read("aA/bB/TWO"), "two");
    EXPECT_EQ(on_disk.read("aA/bB/cC/none"), "-");
    EXPECT_EQ(last_error(), zxplat::k_err_not_found);
    EXPECT_EQ(on_disk.read("aA/Bb2/three"), "three");
    EXPECT_EQ(on_disk.read("aA/none/three"), "-");
    EXPECT_EQ(last_error(), zxplat::k_err_path_not_found);
  }
}

TEST(zxplat_folders, a_relative_name_is_looked_for_where_we_are) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  fs::create_directories(on_disk.dir.file("one/Data"));
  fs::create_directories(on_disk.dir.file("two/dATA"));
  kit::write_file(on_disk.dir.file("one/Data/file"), "one");
  kit::write_file(on_disk.dir.file("two/dATA/file"), "two");
  const WorkingIn there(on_disk.dir.path());
  for (const char* folder : {"one", "two", "one"}) {
    fs::current_path(on_disk.dir.file(folder));
    const Fd fd = files.open("data\\file", OpenMode::read);
    ASSERT_NE(fd, k_no_fd) << folder;
    EXPECT_EQ(read_all(fd), folder);
    files.close(fd);
  }
}

TEST(zxplat_folders, the_longest_components_are_respelled) {
  if (kit::on_windows()) GTEST_SKIP() << k_folds;
  const Spellings on_disk;
  const std::string name = std::string(254, 'x') + "Y";
  on_disk.make(name);
  EXPECT_EQ(on_disk.read(std::string(254, 'x') + "y/file"), name);
  EXPECT_EQ(on_disk.read(in_capitals(name) + "/FILE"), name);
  EXPECT_EQ(on_disk.read(std::string(256, 'x') + "/file"), "-");
}

}  // namespace
