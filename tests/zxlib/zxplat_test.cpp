// zxplat_test.cpp - tests of zxlib/zxplat.h, that is of zxplat_posix*.cpp or
// zxplat_win32*.cpp.

#include "zxplat.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include "kit/cases.h"
#include "kit/faults.h"
#include "kit/process.h"
#include "kit/target.h"
#include "kit/tempdir.h"

namespace {

namespace fs = std::filesystem;

using kit::make_read_only;
using kit::TempDir;
using kit::WorkingIn;
using namespace std::string_view_literals;
using zxplat::Fd;
using zxplat::files;
using zxplat::k_no_fd;
using zxplat::last_error;
using zxplat::NameKind;
using zxplat::OpenMode;
using zxplat::RenameResult;
using zxplat::set_last_error;
using zxplat::Whence;

// No call under test makes this one up.
constexpr int k_untouched = 1234;

constexpr OpenMode k_all_modes[] = {
    OpenMode::read,           OpenMode::create,     OpenMode::create_new,
    OpenMode::create_private, OpenMode::read_write, OpenMode::append,
    OpenMode::read_append,
};

constexpr OpenMode k_existing_modes[] = {OpenMode::read, OpenMode::read_write};

constexpr OpenMode k_new_modes[] = {OpenMode::create_new,
                                    OpenMode::create_private};

// The modes that write into a file that is there already.
constexpr OpenMode k_overwriting_modes[] = {
    OpenMode::create, OpenMode::read_write, OpenMode::append,
    OpenMode::read_append};

std::string describe(std::string_view name, OpenMode mode) {
  return std::string(name) + ", mode " + std::to_string(static_cast<int>(mode));
}

// An open file, closed at the end of the block.
class Open {
 public:
  Open(std::string_view name, OpenMode mode) : fd(files.open(name, mode)) {
    EXPECT_NE(fd, k_no_fd) << describe(name, mode) << ": " << last_error();
  }
  Open(const Open&) = delete;
  Open& operator=(const Open&) = delete;
  ~Open() {
    if (fd != k_no_fd) files.close(fd);
  }

  std::int64_t write(std::string_view bytes) const {
    return files.write(fd, bytes.data(), bytes.size());
  }

  std::string read(std::size_t size = 100) const {
    std::string bytes(size, '?');
    const std::int64_t count = files.read(fd, bytes.data(), size);
    EXPECT_GE(count, 0) << last_error();
    bytes.resize(static_cast<std::size_t>(std::max<std::int64_t>(count, 0)));
    return bytes;
  }

  Fd fd;
};

void write_through(std::string_view name, OpenMode mode,
                   std::string_view bytes) {
  const Open file(name, mode);
  EXPECT_EQ(file.write(bytes), static_cast<std::int64_t>(bytes.size()));
}

std::string read_through(std::string_view name) {
  return Open(name, OpenMode::read).read();
}

void expect_open_fails(std::string_view name, OpenMode mode, int number) {
  set_last_error(k_untouched);
  EXPECT_EQ(files.open(name, mode), k_no_fd) << describe(name, mode);
  EXPECT_EQ(last_error(), number) << describe(name, mode);
}

void expect_missing(std::string_view name, int number) {
  set_last_error(k_untouched);
  EXPECT_EQ(zxplat::kind_of(name), NameKind::missing) << name;
  EXPECT_EQ(last_error(), number) << name;
}

void expect_remove_fails(std::string_view name, int number) {
  set_last_error(k_untouched);
  EXPECT_FALSE(files.remove(name)) << name;
  EXPECT_EQ(last_error(), number) << name;
}

void expect_rename_fails(std::string_view from, std::string_view to,
                         int number) {
  set_last_error(k_untouched);
  EXPECT_EQ(files.rename(from, to), RenameResult::failed) << from << ' ' << to;
  EXPECT_EQ(last_error(), number) << from << ' ' << to;
}

void expect_free(std::string_view name) {
  set_last_error(k_untouched);
  EXPECT_FALSE(zxplat::name_taken(name)) << name;
  EXPECT_EQ(last_error(), zxplat::k_err_not_found) << name;
}

// The names in a folder as the system spells them, sorted.
std::vector<std::string> spellings_in(const std::string& folder) {
  std::vector<std::string> names;
  for (const auto& entry : fs::directory_iterator(folder)) {
    names.push_back(entry.path().filename().string());
  }
  std::sort(names.begin(), names.end());
  return names;
}

using Names = std::vector<std::string>;

std::string with_slashes(std::string name, char slash) {
  for (char& c : name) {
    if (c == '/' || c == '\\') c = slash;
  }
  return name;
}

std::string in_capitals(std::string name) {
  for (char& c : name) {
    if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
  }
  return name;
}

// ------------------------------------------------------------ last error --

TEST(zxplat, the_last_error_is_what_was_stored) {
  for (const int number : {0, 2, 33, 1234}) {
    set_last_error(number);
    EXPECT_EQ(last_error(), number);
  }
}

TEST(zxplat, calls_that_succeed_leave_the_last_error_alone) {
  const TempDir dir;
  const std::string name = dir.file("a");
  const std::string other = dir.file("b");
  char byte = 'x';
  char text[1000];
  set_last_error(k_untouched);

  const Fd fd = files.open(name, OpenMode::create);
  EXPECT_EQ(last_error(), k_untouched) << "create";
  files.write(fd, &byte, 1);
  files.seek(fd, 0, Whence::start);
  files.flush(fd);
  files.size(fd);
  files.close(fd);
  EXPECT_EQ(last_error(), k_untouched) << "descriptor";
  files.close(files.open(name, OpenMode::create));
  files.close(files.open(name, OpenMode::append));
  files.close(files.open("nul", OpenMode::create));
  EXPECT_EQ(last_error(), k_untouched) << "create again";
  files.close(files.open(other, OpenMode::create_new));
  zxplat::copy_time(name, other);
  zxplat::copy_permissions(name, other);
  EXPECT_EQ(last_error(), k_untouched) << "time, permissions";
  files.remove(other);
  files.rename(name, other);
  EXPECT_EQ(last_error(), k_untouched) << "rename";
  zxplat::kind_of(other);
  zxplat::name_taken(other);
  zxplat::same_file(other, other);
  zxplat::on_one_device(other, name);
  EXPECT_EQ(last_error(), k_untouched) << "questions";
  zxplat::current_directory(text);
  zxplat::temp_directory(text);
  zxplat::is_terminal(zxplat::k_stdin_fd);
  zxplat::process.sleep(1);
  zxplat::process.clock();
  zxplat::process.ticks();
  EXPECT_EQ(last_error(), k_untouched) << "process";
}

// --------------------------------------------------------------- opening --

TEST(zxplat, a_created_file_holds_the_bytes_written) {
  const TempDir dir;
  const std::string bytes("a\n\r\n\x1a\0\xff", 7);
  write_through(dir.file("a"), OpenMode::create, bytes);
  EXPECT_EQ(kit::read_file(dir.file("a")), bytes);
  EXPECT_EQ(read_through(dir.file("a")), bytes);
}

TEST(zxplat, create_cuts_an_existing_file_to_nothing) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "long before");
  write_through(dir.file("a"), OpenMode::create, "new");
  EXPECT_EQ(kit::read_file(dir.file("a")), "new");
}

TEST(zxplat, read_only_descriptors_take_no_bytes) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abc");
  const Open file(dir.file("a"), OpenMode::read);
  EXPECT_EQ(file.write("x"), -1);
  EXPECT_EQ(last_error(), zxplat::k_err_bad_handle);
}

TEST(zxplat, write_only_descriptors_give_no_bytes) {
  const TempDir dir;
  for (const OpenMode mode :
       {OpenMode::create_new, OpenMode::create, OpenMode::append}) {
    const Open file(dir.file("a"), mode);
    char byte;
    EXPECT_EQ(files.read(file.fd, &byte, 1), -1);
    EXPECT_EQ(last_error(), zxplat::k_err_bad_handle);
  }
}

TEST(zxplat, read_write_keeps_the_bytes_and_does_both) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abcdef");
  {
    const Open file(dir.file("a"), OpenMode::read_write);
    EXPECT_EQ(file.read(2), "ab");
    EXPECT_EQ(files.seek(file.fd, 2, Whence::start), 2);
    EXPECT_EQ(file.write("XY"), 2);
    EXPECT_EQ(files.seek(file.fd, 0, Whence::current), 4);
    EXPECT_EQ(file.read(), "ef");
  }
  EXPECT_EQ(kit::read_file(dir.file("a")), "abXYef");
}

TEST(zxplat, read_append_reads_anywhere_and_writes_at_the_end) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abc");
  {
    const Open file(dir.file("a"), OpenMode::read_append);
    EXPECT_EQ(files.seek(file.fd, 0, Whence::current), 3);
    EXPECT_EQ(file.read(), "");
    EXPECT_EQ(files.seek(file.fd, 1, Whence::start), 1);
    EXPECT_EQ(file.read(1), "b");
    EXPECT_EQ(file.write("XY"), 2);
    EXPECT_EQ(files.seek(file.fd, 0, Whence::start), 0);
    EXPECT_EQ(file.read(), "abcXY");
  }
  EXPECT_EQ(kit::read_file(dir.file("a")), "abcXY");
}

TEST(zxplat, read_append_makes_a_file_that_is_missing) {
  const TempDir dir;
  write_through(dir.file("a"), OpenMode::read_append, "new");
  EXPECT_EQ(kit::read_file(dir.file("a")), "new");
}

TEST(zxplat, append_makes_a_file_that_is_missing) {
  const TempDir dir;
  write_through(dir.file("a"), OpenMode::append, "one");
  EXPECT_EQ(kit::read_file(dir.file("a")), "one");
}

TEST(zxplat, append_writes_at_the_end_wherever_the_position_is) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "one");
  {
    const Open file(dir.file("a"), OpenMode::append);
    EXPECT_EQ(files.seek(file.fd, 0, Whence::current), 3);
    EXPECT_EQ(files.seek(file.fd, 1, Whence::start), 1);
    EXPECT_EQ(file.write("two"), 3);
  }
  EXPECT_EQ(kit::read_file(dir.file("a")), "onetwo");
}

TEST(zxplat, create_new_makes_a_file) {
  const TempDir dir;
  for (const OpenMode mode : k_new_modes) {
    const std::string name =
        dir.file("new" + std::to_string(static_cast<int>(mode)));
    write_through(name, mode, "bytes");
    EXPECT_EQ(kit::read_file(name), "bytes");
  }
}

TEST(zxplat, create_new_refuses_a_name_that_is_taken) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "kept");
  fs::create_directory(dir.file("folder"));
  for (const OpenMode mode : k_new_modes) {
    expect_open_fails(dir.file("a"), mode, zxplat::k_err_exists_on_create);
    expect_open_fails(dir.file("A"), mode, zxplat::k_err_exists_on_create);
    expect_open_fails(dir.file("folder"), mode, zxplat::k_err_exists_on_create);
  }
  EXPECT_EQ(kit::read_file(dir.file("a")), "kept");
}

TEST(zxplat, create_new_refuses_a_link_that_leads_nowhere) {
  const TempDir dir;
  if (!kit::make_link(dir.file("nowhere"), dir.file("link"))) {
    GTEST_SKIP() << "no links here";
  }
  for (const OpenMode mode : k_new_modes) {
    expect_open_fails(dir.file("link"), mode, zxplat::k_err_exists_on_create);
  }
  EXPECT_EQ(spellings_in(dir.path()), Names{"link"});
}

TEST(zxplat, create_makes_the_file_that_a_link_leads_to) {
  const TempDir dir;
  if (!kit::make_link(dir.file("target"), dir.file("link"))) {
    GTEST_SKIP() << "no links here";
  }
  write_through(dir.file("link"), OpenMode::create, "one");
  EXPECT_EQ(kit::read_file(dir.file("target")), "one");
  write_through(dir.file("link"), OpenMode::append, "two");
  EXPECT_EQ(kit::read_file(dir.file("target")), "onetwo");
}

TEST(zxplat, a_private_file_is_for_its_owner_alone) {
  const TempDir dir;
  write_through(dir.file("a"), OpenMode::create_private, "x");
  if (kit::on_windows()) return;  // the folder's rights decide there
  EXPECT_EQ(fs::status(dir.file("a")).permissions(),
            fs::perms::owner_read | fs::perms::owner_write);
}

TEST(zxplat, a_missing_file_is_not_found) {
  const TempDir dir;
  for (const OpenMode mode : k_existing_modes) {
    expect_open_fails(dir.file("a"), mode, zxplat::k_err_not_found);
  }
  EXPECT_TRUE(fs::is_empty(dir.path()));
}

TEST(zxplat, a_file_in_a_missing_folder_is_a_missing_path) {
  const TempDir dir;
  for (const OpenMode mode : k_all_modes) {
    expect_open_fails(dir.file("no/a"), mode, zxplat::k_err_path_not_found);
  }
  expect_missing(dir.file("no/a"), zxplat::k_err_path_not_found);
  expect_remove_fails(dir.file("no/a"), zxplat::k_err_path_not_found);
}

TEST(zxplat, a_file_is_no_folder_to_look_in) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  for (const OpenMode mode : k_all_modes) {
    expect_open_fails(dir.file("a/b"), mode, zxplat::k_err_path_not_found);
  }
  expect_missing(dir.file("a/b"), zxplat::k_err_path_not_found);
  expect_remove_fails(dir.file("A/b"), zxplat::k_err_path_not_found);
}

TEST(zxplat, a_folder_does_not_open) {
  const TempDir dir;
  for (const OpenMode mode : {OpenMode::read, OpenMode::create,
                              OpenMode::read_write, OpenMode::append}) {
    expect_open_fails(dir.path(), mode, zxplat::k_err_denied);
  }
}

TEST(zxplat, a_file_without_write_permission_opens_for_reading_alone) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "kept");
  make_read_only(dir.file("a"));
  for (const OpenMode mode : k_overwriting_modes) {
    expect_open_fails(dir.file("a"), mode, zxplat::k_err_denied);
    expect_open_fails(dir.file("A"), mode, zxplat::k_err_denied);
  }
  EXPECT_EQ(read_through(dir.file("a")), "kept");
}

TEST(zxplat, links_in_a_circle_are_a_missing_path) {
  const TempDir dir;
  if (!kit::make_link(dir.file("b"), dir.file("a")) ||
      !kit::make_link(dir.file("a"), dir.file("b"))) {
    GTEST_SKIP() << "no links here";
  }
  expect_open_fails(dir.file("a"), OpenMode::read,
                    zxplat::k_err_path_not_found);
  expect_open_fails(dir.file("a"), OpenMode::create,
                    zxplat::k_err_path_not_found);
  expect_missing(dir.file("a/x"), zxplat::k_err_path_not_found);
}

TEST(zxplat, running_out_of_descriptors_is_a_failure_of_its_own) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  const kit::FewFiles few(64);
  std::vector<Fd> open;
  set_last_error(k_untouched);
  for (;;) {
    const Fd fd = files.open("nul", OpenMode::read);
    if (fd == k_no_fd || open.size() > 100'000) break;
    open.push_back(fd);
  }
  const int number = last_error();
  const NameKind kind = zxplat::kind_of(dir.file("A"));
  const int kind_number = last_error();
  for (const Fd fd : open) EXPECT_TRUE(files.close(fd));
  EXPECT_EQ(number, zxplat::k_err_too_many_open);
  // Without a descriptor there may be no telling, which is not "missing".
  EXPECT_TRUE(kind == NameKind::file ||
              kind_number == zxplat::k_err_too_many_open)
      << kind_number;
}

// ---------------------------------------------------- reading and writing --

TEST(zxplat, reading_ends_with_a_count_of_zero) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abc");
  const Open file(dir.file("a"), OpenMode::read);
  EXPECT_EQ(file.read(2), "ab");
  EXPECT_EQ(file.read(2), "c");
  EXPECT_EQ(file.read(2), "");
}

TEST(zxplat, transfers_of_no_bytes_succeed) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abc");
  const Open file(dir.file("a"), OpenMode::read_write);
  EXPECT_EQ(files.read(file.fd, nullptr, 0), 0);
  EXPECT_EQ(files.write(file.fd, nullptr, 0), 0);
}

TEST(zxplat, a_text_is_written_whole_however_little_goes_at_once) {
  const TempDir dir;
  const std::string text(1000, 'x');
  for (const std::size_t most : {1U, 7U, 999U, 1000U, 2000U}) {
    kit::Faults faults;
    faults.limit_writes(most);
    {
      const Open file(dir.file("a"), OpenMode::create);
      EXPECT_TRUE(zxplat::write_all(file.fd, text));
      EXPECT_TRUE(zxplat::write_all(file.fd, ""));
    }
    EXPECT_EQ(faults.count(kit::Call::write),
              static_cast<int>((text.size() + most - 1) / most));
    EXPECT_EQ(kit::read_file(dir.file("a")), text);
  }
}

TEST(zxplat, a_text_whose_bytes_are_refused_is_given_up) {
  const TempDir dir;
  const Open file(dir.file("a"), OpenMode::create);
  kit::Faults faults;
  faults.limit_writes(2);
  faults.fail_nth(kit::Call::write, 2, zxplat::k_err_disk_full);
  EXPECT_FALSE(zxplat::write_all(file.fd, "abcdef"));
  EXPECT_EQ(last_error(), zxplat::k_err_disk_full);
  EXPECT_EQ(faults.count(kit::Call::write), 2);
  EXPECT_EQ(kit::read_file(dir.file("a")), "ab");
  faults.limit_writes(0);  // a write of nothing, again and again
  EXPECT_FALSE(zxplat::write_all(file.fd, "abcdef"));
}

TEST(zxplat, seeking_counts_from_start_position_and_end) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "0123456789");
  const Open file(dir.file("a"), OpenMode::read);
  EXPECT_EQ(files.seek(file.fd, 4, Whence::start), 4);
  EXPECT_EQ(file.read(1), "4");
  EXPECT_EQ(files.seek(file.fd, -2, Whence::current), 3);
  EXPECT_EQ(file.read(1), "3");
  EXPECT_EQ(files.seek(file.fd, -1, Whence::end), 9);
  EXPECT_EQ(file.read(1), "9");
}

TEST(zxplat, positions_go_beyond_32_bits) {
  const TempDir dir;
  const Open file(dir.file("a"), OpenMode::create);
  constexpr std::int64_t k_far = 0x1'2345'6789;
  EXPECT_EQ(files.seek(file.fd, k_far, Whence::start), k_far);
  EXPECT_EQ(files.seek(file.fd, 1, Whence::current), k_far + 1);
}

TEST(zxplat, a_position_ahead_of_the_start_is_refused) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abc");
  const Open file(dir.file("a"), OpenMode::read);
  files.seek(file.fd, 2, Whence::start);
  EXPECT_EQ(files.seek(file.fd, -1, Whence::start), -1);
  EXPECT_EQ(last_error(), zxplat::k_err_bad_parameter);
  EXPECT_EQ(files.seek(file.fd, 0, Whence::current), 2);
}

TEST(zxplat, a_gap_behind_the_end_is_filled_with_zeros) {
  const TempDir dir;
  {
    const Open file(dir.file("a"), OpenMode::create);
    files.seek(file.fd, 3, Whence::start);
    EXPECT_EQ(file.write("x"), 1);
  }
  EXPECT_EQ(kit::read_file(dir.file("a")), "\0\0\0x"sv);
}

TEST(zxplat, the_size_counts_what_was_written_and_moves_nothing) {
  const TempDir dir;
  const Open file(dir.file("a"), OpenMode::create);
  EXPECT_EQ(files.size(file.fd), 0);
  EXPECT_EQ(file.write("abcdef"), 6);
  EXPECT_EQ(files.seek(file.fd, 2, Whence::start), 2);
  EXPECT_EQ(files.size(file.fd), 6);
  EXPECT_EQ(files.seek(file.fd, 0, Whence::current), 2);
}

TEST(zxplat, flushing_leaves_the_bytes_in_the_file) {
  const TempDir dir;
  const Open file(dir.file("a"), OpenMode::create);
  EXPECT_EQ(file.write("abc"), 3);
  EXPECT_TRUE(files.flush(file.fd)) << last_error();
  EXPECT_EQ(kit::read_file(dir.file("a")), "abc");
}

TEST(zxplat, a_closed_descriptor_is_a_bad_handle_to_every_call) {
  const TempDir dir;
  const Fd fd = files.open(dir.file("a"), OpenMode::create);
  ASSERT_TRUE(files.close(fd));
  char byte = 'x';
  const auto expect_bad_handle = [](bool is_refused, const char* call) {
    EXPECT_TRUE(is_refused) << call;
    EXPECT_EQ(last_error(), zxplat::k_err_bad_handle) << call;
    set_last_error(k_untouched);
  };
  expect_bad_handle(files.read(fd, &byte, 1) == -1, "read");
  expect_bad_handle(files.write(fd, &byte, 1) == -1, "write");
  expect_bad_handle(files.seek(fd, 0, Whence::start) == -1, "seek");
  expect_bad_handle(!files.flush(fd), "flush");
  expect_bad_handle(files.size(fd) == -1, "size");
  expect_bad_handle(!files.set_size(fd, 1), "set_size");
  expect_bad_handle(!files.lock(fd, 0, 1), "lock");
  expect_bad_handle(!files.unlock(fd, 0, 1), "unlock");
  for (const auto mode : {zxplat::StreamMode::binary, zxplat::StreamMode::text})
    expect_bad_handle(!files.set_mode(fd, mode), "set_mode");
  expect_bad_handle(!files.close(fd), "close");
  expect_bad_handle(!zxplat::set_binary(fd), "set_binary");
}

TEST(zxplat, no_descriptor_at_all_is_a_bad_handle_as_well) {
  char byte;
  EXPECT_EQ(files.read(k_no_fd, &byte, 1), -1);
  EXPECT_EQ(last_error(), zxplat::k_err_bad_handle);
  EXPECT_FALSE(files.close(k_no_fd));
  EXPECT_EQ(last_error(), zxplat::k_err_bad_handle);
}

TEST(zxplat, a_full_device_fails_the_write) {
  const std::string device = kit::full_device();
  if (device.empty()) GTEST_SKIP() << "no device that is full";
  for (const OpenMode mode : k_overwriting_modes) {
    const Open file(device, mode);
    set_last_error(k_untouched);
    EXPECT_EQ(file.write("x"), -1);
    EXPECT_EQ(last_error(), zxplat::k_err_disk_full);
  }
  EXPECT_EQ(zxplat::kind_of(device), NameKind::device);
}

TEST(zxplat, a_pipe_has_an_end_and_no_size) {
  const kit::Pipe pipe = kit::make_pipe();
  ASSERT_NE(pipe.reader, k_no_fd);
  char bytes[10];
  EXPECT_EQ(files.write(pipe.writer, "abc", 3), 3);
  EXPECT_TRUE(files.flush(pipe.writer)) << last_error();
  EXPECT_LE(files.size(pipe.writer), 0);
  EXPECT_EQ(files.read(pipe.reader, bytes, 10), 3);
  EXPECT_TRUE(files.close(pipe.writer));
  EXPECT_EQ(files.read(pipe.reader, bytes, 10), 0);
  EXPECT_TRUE(files.close(pipe.reader));
}

TEST(zxplat, a_write_that_nobody_will_read_is_an_error_and_no_signal) {
  zxplat::prepare_process();
  const kit::Pipe pipe = kit::make_pipe();
  ASSERT_NE(pipe.writer, k_no_fd);
  EXPECT_TRUE(files.close(pipe.reader));
  EXPECT_EQ(files.write(pipe.writer, "x", 1), -1);
  EXPECT_EQ(last_error(), zxplat::k_err_broken_pipe);
  EXPECT_TRUE(files.close(pipe.writer));
}

// ----------------------------------------------------------------- names --

TEST(zxplat, both_slashes_separate) {
  const TempDir dir;
  fs::create_directory(dir.file("folder"));
  kit::write_file(dir.file("folder/a"), "bytes");
  for (const char slash : {'/', '\\'}) {
    const std::string name = with_slashes(dir.file("folder/a"), slash);
    EXPECT_EQ(read_through(name), "bytes") << name;
    EXPECT_EQ(zxplat::kind_of(name), NameKind::file) << name;
  }
}

TEST(zxplat, relative_names_start_from_the_working_directory) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  fs::create_directory("folder");
  write_through("folder\\a", OpenMode::create, "bytes");
  for (const char* name : {"folder\\a", "folder/a", ".\\folder\\a",
                           "folder\\..\\FOLDER\\A", "folder\\\\a"}) {
    EXPECT_EQ(read_through(name), "bytes") << name;
  }
  EXPECT_EQ(zxplat::kind_of("."), NameKind::directory);
}

TEST(zxplat, a_name_without_bytes_is_a_missing_path) {
  for (const OpenMode mode : k_all_modes) {
    expect_open_fails("", mode, zxplat::k_err_path_not_found);
  }
  expect_missing("", zxplat::k_err_path_not_found);
  expect_remove_fails("", zxplat::k_err_path_not_found);
}

// Every call that takes a name refuses this one.
void expect_refused_everywhere(std::string_view name, int number) {
  const TempDir dir;
  const std::string good = dir.file("a");
  kit::write_file(good, "");
  for (const OpenMode mode : k_all_modes) expect_open_fails(name, mode, number);
  expect_missing(name, number);
  expect_remove_fails(name, number);
  expect_rename_fails(name, good, number);
  expect_rename_fails(good, name, number);
  const auto expect_false = [&](bool result, const char* call) {
    EXPECT_FALSE(result) << call;
    EXPECT_EQ(last_error(), number) << call;
    set_last_error(k_untouched);
  };
  expect_false(zxplat::name_taken(name), "name_taken");
  expect_false(zxplat::same_file(good, name), "same_file");
  expect_false(zxplat::same_file(name, good), "same_file");
  expect_false(zxplat::copy_time(good, name), "copy_time");
  expect_false(zxplat::copy_time(name, good), "copy_time");
  expect_false(zxplat::copy_permissions(good, name), "copy_permissions");
  expect_false(zxplat::copy_permissions(name, good), "copy_permissions");
  expect_false(files.make_folder(name), "make_folder");
  expect_false(files.remove_folder(name), "remove_folder");
  expect_false(zxplat::set_current_directory(name), "set_current_directory");
  EXPECT_TRUE(zxplat::on_one_device(name, good));
  EXPECT_TRUE(zxplat::on_one_device(good, name));
  EXPECT_EQ(last_error(), k_untouched);
}

TEST(zxplat, a_name_with_a_nul_byte_is_refused) {
  expect_refused_everywhere("a\0b"sv, zxplat::k_err_bad_name);
  expect_refused_everywhere("nul\0"sv, zxplat::k_err_bad_name);
  expect_refused_everywhere("\0"sv, zxplat::k_err_bad_name);
}

TEST(zxplat, a_name_beyond_the_longest_is_refused) {
  expect_refused_everywhere(std::string(zxplat::k_max_name + 1, 'a'),
                            zxplat::k_err_bad_name);
}

TEST(zxplat, the_longest_name_is_taken_natively) {
  if (kit::on_windows()) GTEST_SKIP() << "the system's own limit is lower";
  const TempDir dir;
  const WorkingIn there(dir.path());
  kit::write_file("a", "bytes");
  std::string name = "a";
  while (name.size() + 2 <= zxplat::k_max_name) name.insert(0, ".\\");
  ASSERT_EQ(name.size(), zxplat::k_max_name);
  EXPECT_EQ(read_through(name), "bytes");
  name.back() = 'A';
  EXPECT_EQ(read_through(name), "bytes");
}

TEST(zxplat, a_component_beyond_the_systems_longest_does_not_open) {
  const TempDir dir;
  const std::string name = dir.file(std::string(300, 'a'));
  for (const OpenMode mode : k_all_modes) {
    EXPECT_EQ(files.open(name, mode), k_no_fd);
  }
  EXPECT_TRUE(fs::is_empty(dir.path()));
}

TEST(zxplat, the_native_names_have_one_drive) {
  if (kit::on_windows()) GTEST_SKIP() << "drives are the system's own";
  const TempDir dir;
  const WorkingIn there(dir.path());
  kit::write_file("x", "bytes");
  const std::string full = with_slashes(dir.file("x"), '\\');
  for (const std::string drive : {"C:", "c:"}) {
    EXPECT_EQ(read_through(drive + full), "bytes");
    EXPECT_EQ(read_through(drive + "x"), "bytes");
    EXPECT_EQ(read_through(drive + ".\\X"), "bytes");
    EXPECT_EQ(zxplat::kind_of(drive), NameKind::directory);
    EXPECT_EQ(zxplat::kind_of(drive + "\\"), NameKind::directory);
    EXPECT_TRUE(zxplat::same_file(drive, dir.path()));
  }
  for (const std::string drive : {"A:", "b:", "D:", "z:"}) {
    expect_missing(drive + full, zxplat::k_err_path_not_found);
    expect_missing(drive + "x", zxplat::k_err_path_not_found);
    expect_missing(drive, zxplat::k_err_path_not_found);
    expect_open_fails(drive + "x", OpenMode::create,
                      zxplat::k_err_path_not_found);
  }
  EXPECT_EQ(spellings_in(dir.path()), Names{"x"});
}

TEST(zxplat, the_native_names_have_no_servers) {
  if (kit::on_windows()) GTEST_SKIP() << "servers are the system's own";
  const TempDir dir;
  kit::write_file(dir.file("x"), "bytes");
  const std::string full = dir.file("x");
  for (const std::string slash : {"\\", "/"}) {
    expect_missing(slash + full, zxplat::k_err_path_not_found);
    expect_missing("\\" + slash, zxplat::k_err_path_not_found);
    expect_missing("/" + slash + "host\\share", zxplat::k_err_path_not_found);
    expect_open_fails(slash + full, OpenMode::read,
                      zxplat::k_err_path_not_found);
  }
}

TEST(zxplat, a_colon_elsewhere_is_a_byte_like_any_other_natively) {
  if (kit::on_windows()) GTEST_SKIP() << "the system has its own use for it";
  const TempDir dir;
  const WorkingIn there(dir.path());
  for (const std::string name : {"1:x", "ab:c", ":"}) {
    write_through(name, OpenMode::create, name);
    EXPECT_EQ(kit::read_file(name), name);
  }
}

// ----------------------------------------------------- letters of a name --

TEST(zxplat, a_file_is_found_in_letters_of_another_case) {
  const TempDir dir;
  fs::create_directories(dir.file("Folder/Inner"));
  kit::write_file(dir.file("Folder/Inner/File.Txt"), "bytes");
  for (const char* name :
       {"folder\\inner\\file.txt", "FOLDER/INNER/FILE.TXT",
        "Folder\\inner\\File.Txt", "folder/../folder/INNER/./file.TXT"}) {
    EXPECT_EQ(read_through(dir.file(name)), "bytes") << name;
    EXPECT_EQ(zxplat::kind_of(dir.file(name)), NameKind::file) << name;
    EXPECT_TRUE(zxplat::name_taken(dir.file(name))) << name;
  }
  EXPECT_EQ(zxplat::kind_of(dir.file("FOLDER\\")), NameKind::directory);
  expect_missing(dir.file("FOLDER\\INNER\\other"), zxplat::k_err_not_found);
  expect_missing(dir.file("FOLDER\\other\\file"), zxplat::k_err_path_not_found);
}

TEST(zxplat, a_name_is_found_in_a_folder_of_many) {
  const TempDir dir;
  for (int i = 0; i < 500; ++i) {
    kit::write_file(dir.file("Some-Longer-Name-" + std::to_string(i)), "");
  }
  kit::write_file(dir.file("Wanted"), "bytes");
  EXPECT_EQ(read_through(dir.file("wANTED")), "bytes");
  expect_missing(dir.file("wANTE"), zxplat::k_err_not_found);
  expect_missing(dir.file("wANTEDd"), zxplat::k_err_not_found);
}

// On a system that keeps such names apart, all of these are files; on one
// that does not, the last writing made the one there is.
TEST(zxplat, of_several_candidates_the_first_in_byte_order_is_taken) {
  const TempDir dir;
  kit::write_file(dir.file("aaB"), "aaB");
  kit::write_file(dir.file("aBa"), "aBa");
  kit::write_file(dir.file("Baa"), "Baa");
  kit::write_file(dir.file("aAB"), "Aab");
  kit::write_file(dir.file("AAB"), "AAB");
  EXPECT_EQ(read_through(dir.file("aab")), "AAB");
  EXPECT_EQ(read_through(dir.file("Aab")), "AAB");
}

TEST(zxplat, the_exact_spelling_wins) {
  const TempDir dir;
  kit::write_file(dir.file("AB"), "x");
  kit::write_file(dir.file("Ab"), "x");
  kit::write_file(dir.file("ab"), "right");
  EXPECT_EQ(read_through(dir.file("ab")), "right");
  write_through(dir.file("ab"), OpenMode::create, "new");
  EXPECT_EQ(kit::read_file(dir.file("ab")), "new");
  EXPECT_TRUE(files.remove(dir.file("ab")));
  EXPECT_FALSE(fs::exists(dir.file("ab")));
}

TEST(zxplat, letters_beyond_ascii_are_not_folded_natively) {
  if (kit::on_windows()) GTEST_SKIP() << "the system folds as it likes";
  const TempDir dir;
  kit::write_file(dir.file("\xc4"), "");
  expect_missing(dir.file("\xe4"), zxplat::k_err_not_found);
  kit::write_file(dir.file("["), "");
  expect_missing(dir.file("{"), zxplat::k_err_not_found);
}

TEST(zxplat, create_opens_the_file_that_is_there_in_another_case) {
  const TempDir dir;
  kit::write_file(dir.file("Out.csv"), "before");
  write_through(dir.file("out.CSV"), OpenMode::create, "new");
  EXPECT_EQ(spellings_in(dir.path()), Names{"Out.csv"});
  write_through(dir.file("OUT.csv"), OpenMode::append, "er");
  EXPECT_EQ(spellings_in(dir.path()), Names{"Out.csv"});
  EXPECT_EQ(kit::read_file(dir.file("Out.csv")), "newer");
}

TEST(zxplat, a_new_file_is_spelled_as_asked_for) {
  const TempDir dir;
  fs::create_directory(dir.file("Folder"));
  write_through(dir.file("FOLDER\\Aa"), OpenMode::create, "");
  write_through(dir.file("FOLDER\\Bb"), OpenMode::create_new, "");
  write_through(dir.file("folder\\Cc"), OpenMode::create_private, "");
  write_through(dir.file("folder\\Dd"), OpenMode::append, "");
  EXPECT_EQ(spellings_in(dir.path()), Names{"Folder"});
  EXPECT_EQ(spellings_in(dir.file("Folder")), (Names{"Aa", "Bb", "Cc", "Dd"}));
}

// ------------------------------------------------------- the null device --

TEST(zxplat, nul_is_the_null_device_in_any_case_and_mode) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  for (const char* name : {"nul", "NUL", "Nul"}) {
    for (const OpenMode mode : k_all_modes) {
      EXPECT_TRUE(files.close(Open(name, mode).fd)) << describe(name, mode);
    }
    const Open device(name, OpenMode::read_write);
    EXPECT_EQ(device.write("swallowed"), 9);
    EXPECT_EQ(device.read(), "");
    EXPECT_FALSE(zxplat::is_terminal(device.fd));
  }
  EXPECT_TRUE(fs::is_empty(dir.path()));
}

TEST(zxplat, nul_is_no_file) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  kit::write_file("a", "kept");
  expect_missing("nul", zxplat::k_err_not_found);
  expect_missing("NUL", zxplat::k_err_not_found);
  expect_remove_fails("nul", zxplat::k_err_not_found);
  expect_rename_fails("Nul", "b", zxplat::k_err_not_found);
  expect_rename_fails("a", "nuL", zxplat::k_err_exists);
  EXPECT_TRUE(zxplat::name_taken("nul"));
  EXPECT_FALSE(zxplat::same_file("nul", "nul"));
  EXPECT_EQ(spellings_in(dir.path()), Names{"a"});
}

// On a system that lets a file be called so, the device still has the name.
TEST(zxplat, a_file_called_nul_is_out_of_reach) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  kit::write_file("nul", "kept");
  EXPECT_EQ(read_through("nul"), "");
  expect_missing("nul", zxplat::k_err_not_found);
  expect_remove_fails("nul", zxplat::k_err_not_found);
  expect_rename_fails("nul", "b", zxplat::k_err_not_found);
}

// ----------------------------------------------------------- the printer --

TEST(zxplat, the_native_names_have_no_printer) {
  if (kit::on_windows()) GTEST_SKIP() << "the system may have one";
  const TempDir dir;
  const WorkingIn there(dir.path());
  for (const std::string name : {"prn", "PRN", "Prn", "lpt1", "LPT1", "Lpt1"}) {
    expect_refused_everywhere(name, zxplat::k_err_not_found);
  }
  EXPECT_TRUE(fs::is_empty(dir.path()));
}

TEST(zxplat, names_that_begin_or_end_like_the_printer_are_names_natively) {
  if (kit::on_windows()) GTEST_SKIP() << "the system has its own rules";
  const TempDir dir;
  const WorkingIn there(dir.path());
  for (const std::string name :
       {"prn.txt", "aprn", "prn1", "lpt", "lpt2", "lpt11", ".\\prn"}) {
    write_through(name, OpenMode::create, name);
    EXPECT_EQ(read_through(name), name);
  }
}

// -------------------------------------------------------------- renaming --

TEST(zxplat, a_rename_moves_the_bytes_to_the_new_name) {
  const TempDir dir;
  fs::create_directory(dir.file("folder"));
  kit::write_file(dir.file("a"), "bytes");
  EXPECT_EQ(files.rename(dir.file("a"), dir.file("folder\\b")),
            RenameResult::done);
  EXPECT_FALSE(fs::exists(dir.file("a")));
  EXPECT_EQ(kit::read_file(dir.file("folder/b")), "bytes");
}

TEST(zxplat, a_rename_finds_names_and_folders_in_another_case) {
  const TempDir dir;
  fs::create_directory(dir.file("Folder"));
  kit::write_file(dir.file("Aa"), "bytes");
  EXPECT_EQ(files.rename(dir.file("aA"), dir.file("FOLDER\\Bb")),
            RenameResult::done);
  EXPECT_EQ(spellings_in(dir.path()), Names{"Folder"});
  EXPECT_EQ(spellings_in(dir.file("Folder")), Names{"Bb"});
}

TEST(zxplat, a_rename_never_replaces) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "source");
  kit::write_file(dir.file("Target"), "kept");
  fs::create_directory(dir.file("folder"));
  for (const char* to : {"Target", "tARGET", "folder", "FOLDER"}) {
    expect_rename_fails(dir.file("a"), dir.file(to), zxplat::k_err_exists);
  }
  EXPECT_EQ(kit::read_file(dir.file("a")), "source");
  EXPECT_EQ(kit::read_file(dir.file("Target")), "kept");
}

TEST(zxplat, a_rename_may_change_the_case_alone) {
  const TempDir dir;
  kit::write_file(dir.file("name"), "bytes");
  EXPECT_EQ(files.rename(dir.file("name"), dir.file("Name")),
            RenameResult::done);
  EXPECT_EQ(kit::read_file(dir.file("Name")), "bytes");
  EXPECT_EQ(files.rename(dir.file("NAME"), dir.file("NaMe")),
            RenameResult::done);
  EXPECT_EQ(kit::read_file(dir.file("NaMe")), "bytes");
  // The emulator says that it is done, and leaves the letters as they were.
  if (kit::on_windows()) return;
  EXPECT_EQ(spellings_in(dir.path()), Names{"NaMe"});
}

TEST(zxplat, a_rename_to_the_same_name_changes_nothing) {
  const TempDir dir;
  kit::write_file(dir.file("name"), "bytes");
  EXPECT_EQ(files.rename(dir.file("name"), dir.file("name")),
            RenameResult::done);
  EXPECT_EQ(spellings_in(dir.path()), Names{"name"});
  EXPECT_EQ(kit::read_file(dir.file("name")), "bytes");
}

TEST(zxplat, a_rename_to_another_name_of_the_same_file_is_refused) {
  if (kit::on_windows()) GTEST_SKIP() << "the emulator does nothing, gladly";
  const TempDir dir;
  kit::write_file(dir.file("a"), "bytes");
  fs::create_hard_link(dir.file("a"), dir.file("b"));
  expect_rename_fails(dir.file("a"), dir.file("b"), zxplat::k_err_exists);
  EXPECT_EQ(spellings_in(dir.path()), (Names{"a", "b"}));
}

TEST(zxplat, a_rename_of_what_is_not_there_fails) {
  const TempDir dir;
  kit::write_file(dir.file("taken"), "kept");
  expect_rename_fails(dir.file("a"), dir.file("b"), zxplat::k_err_not_found);
  expect_rename_fails(dir.file("a"), dir.file("taken"),
                      zxplat::k_err_not_found);
  expect_rename_fails(dir.file("no\\a"), dir.file("b"),
                      zxplat::k_err_path_not_found);
}

TEST(zxplat, a_rename_into_a_missing_folder_fails) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "kept");
  expect_rename_fails(dir.file("a"), dir.file("no\\b"),
                      zxplat::k_err_path_not_found);
  EXPECT_EQ(kit::read_file(dir.file("a")), "kept");
}

TEST(zxplat, a_rename_moves_a_link_and_not_its_target) {
  const TempDir dir;
  if (!kit::make_link(dir.file("nowhere"), dir.file("link"))) {
    GTEST_SKIP() << "no links here";
  }
  kit::write_file(dir.file("a"), "");
  expect_rename_fails(dir.file("a"), dir.file("link"), zxplat::k_err_exists);
  EXPECT_EQ(files.rename(dir.file("link"), dir.file("moved")),
            RenameResult::done);
  EXPECT_EQ(spellings_in(dir.path()), (Names{"a", "moved"}));
}

TEST(zxplat, a_rename_across_devices_says_so) {
  const std::string other = kit::other_device_folder();
  if (other.empty()) GTEST_SKIP() << "no second device";
  const TempDir dir;
  kit::write_file(dir.file("a"), "kept");
  const std::string target = other + "/zxplat-no-such-file";
  set_last_error(k_untouched);
  EXPECT_EQ(files.rename(dir.file("a"), target), RenameResult::other_device);
  EXPECT_EQ(last_error(), zxplat::k_err_other_device);
  EXPECT_EQ(kit::read_file(dir.file("a")), "kept");
  EXPECT_FALSE(fs::exists(target));
}

// -------------------------------------------------------------- deleting --

TEST(zxplat, remove_deletes_a_file_in_any_spelling) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  kit::write_file(dir.file("Bb"), "");
  EXPECT_TRUE(files.remove(dir.file("a")));
  EXPECT_TRUE(files.remove(dir.file("bB")));
  EXPECT_TRUE(fs::is_empty(dir.path()));
}

TEST(zxplat, remove_leaves_folders_alone) {
  const TempDir dir;
  fs::create_directory(dir.file("folder"));
  expect_remove_fails(dir.file("folder"), zxplat::k_err_denied);
  expect_remove_fails(dir.file("FOLDER"), zxplat::k_err_denied);
  EXPECT_TRUE(fs::exists(dir.file("folder")));
}

TEST(zxplat, remove_leaves_a_file_without_write_permission_alone) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  make_read_only(dir.file("a"));
  expect_remove_fails(dir.file("a"), zxplat::k_err_denied);
  EXPECT_TRUE(fs::exists(dir.file("a")));
}

TEST(zxplat, remove_of_a_missing_file_fails) {
  const TempDir dir;
  expect_remove_fails(dir.file("a"), zxplat::k_err_not_found);
}

TEST(zxplat, remove_deletes_a_link_and_not_its_target) {
  const TempDir dir;
  kit::write_file(dir.file("target"), "kept");
  make_read_only(dir.file("target"));
  if (!kit::make_link(dir.file("target"), dir.file("link"))) {
    GTEST_SKIP() << "no links here";
  }
  EXPECT_TRUE(files.remove(dir.file("link")));
  EXPECT_EQ(spellings_in(dir.path()), Names{"target"});
}

// ------------------------------------------------- questions about names --

TEST(zxplat, kinds_tell_files_from_folders) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  EXPECT_EQ(zxplat::kind_of(dir.file("a")), NameKind::file);
  EXPECT_EQ(zxplat::kind_of(dir.path()), NameKind::directory);
  EXPECT_EQ(zxplat::kind_of(dir.path() + "\\"), NameKind::directory);
  EXPECT_EQ(zxplat::kind_of(dir.path() + "/"), NameKind::directory);
  EXPECT_EQ(zxplat::kind_of(dir.file("a\\")), NameKind::missing);
  EXPECT_EQ(zxplat::kind_of("\\"), NameKind::directory);
  expect_missing(dir.file("b"), zxplat::k_err_not_found);
}

TEST(zxplat, the_kind_of_a_link_is_that_of_its_target) {
  const TempDir dir;
  if (!kit::make_link(dir.path(), dir.file("folder")) ||
      !kit::make_link("nowhere", dir.file("link"))) {
    GTEST_SKIP() << "no links here";
  }
  EXPECT_EQ(zxplat::kind_of(dir.file("folder")), NameKind::directory);
  expect_missing(dir.file("link"), zxplat::k_err_not_found);
}

TEST(zxplat, a_name_is_taken_by_whatever_has_it) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  EXPECT_TRUE(zxplat::name_taken(dir.file("a")));
  EXPECT_TRUE(zxplat::name_taken(dir.file("A")));
  EXPECT_TRUE(zxplat::name_taken(dir.path()));
  expect_free(dir.file("b"));
}

TEST(zxplat, a_name_in_a_missing_folder_is_not_called_free) {
  const TempDir dir;
  set_last_error(k_untouched);
  EXPECT_FALSE(zxplat::name_taken(dir.file("no\\a")));
  EXPECT_EQ(last_error(), zxplat::k_err_path_not_found);
}

TEST(zxplat, a_name_is_taken_by_a_link_that_leads_nowhere) {
  const TempDir dir;
  if (!kit::make_link("nowhere", dir.file("link"))) {
    GTEST_SKIP() << "no links here";
  }
  EXPECT_TRUE(zxplat::name_taken(dir.file("link")));
  EXPECT_TRUE(zxplat::name_taken(dir.file("LINK")));
  expect_free(dir.file("nowhere"));
}

TEST(zxplat, one_file_is_recognised_under_several_names) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  kit::write_file("a", "same");
  kit::write_file("b", "same");
  fs::create_hard_link("a", "hard");
  for (const std::string& name :
       {std::string("a"), std::string("A"), std::string(".\\a"),
        std::string("hard"), dir.file("a")}) {
    EXPECT_TRUE(zxplat::same_file("a", name)) << name;
    EXPECT_TRUE(zxplat::same_file(name, "a")) << name;
    EXPECT_FALSE(zxplat::same_file("b", name)) << name;
  }
}

TEST(zxplat, a_link_is_the_same_file_as_its_target) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  if (!kit::make_link(dir.file("a"), dir.file("link"))) {
    GTEST_SKIP() << "no links here";
  }
  EXPECT_TRUE(zxplat::same_file(dir.file("a"), dir.file("link")));
}

TEST(zxplat, a_missing_file_is_not_the_same_as_any) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  EXPECT_FALSE(zxplat::same_file(dir.file("a"), dir.file("b")));
  EXPECT_EQ(last_error(), zxplat::k_err_not_found);
  EXPECT_FALSE(zxplat::same_file(dir.file("b"), dir.file("b")));
}

TEST(zxplat, names_of_one_folder_lie_on_one_device) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  kit::write_file("a", "");
  EXPECT_TRUE(zxplat::on_one_device("a", "b"));
  EXPECT_TRUE(zxplat::on_one_device(dir.file("a"), "b"));
  EXPECT_TRUE(zxplat::on_one_device("a", dir.file("b")));
}

TEST(zxplat, what_cannot_be_told_counts_as_one_device) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  set_last_error(k_untouched);
  EXPECT_TRUE(zxplat::on_one_device(dir.file("missing"), dir.file("b")));
  EXPECT_TRUE(zxplat::on_one_device(dir.file("a"), dir.file("no\\b")));
  EXPECT_EQ(last_error(), k_untouched);
}

TEST(zxplat, another_device_is_known_ahead_of_the_rename) {
  const std::string other = kit::other_device_folder();
  if (other.empty()) GTEST_SKIP() << "no second device";
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  EXPECT_FALSE(zxplat::on_one_device(dir.file("a"), other + "\\b"));
  EXPECT_FALSE(zxplat::on_one_device(dir.file("A"), other + "/b"));
  EXPECT_FALSE(zxplat::on_one_device(dir.file("a"), in_capitals(other) + "/b"));
}

// Two files, the first of which was last written long ago.
class OldAndNew {
 public:
  OldAndNew() {
    kit::write_file(from, "x");
    kit::write_file(to, "kept");
    fs::last_write_time(from,
                        fs::last_write_time(from) - std::chrono::hours(1000));
  }

  const TempDir dir;
  const std::string from = dir.file("From");
  const std::string to = dir.file("To");
};

TEST(zxplat, a_copied_time_is_the_time_alone) {
  const OldAndNew both;
  make_read_only(both.from);
  const fs::perms before = fs::status(both.to).permissions();
  EXPECT_TRUE(zxplat::copy_time(both.dir.file("FROM"), both.dir.file("TO")))
      << last_error();
  EXPECT_EQ(fs::last_write_time(both.to), fs::last_write_time(both.from));
  EXPECT_EQ(fs::status(both.to).permissions(), before);
  EXPECT_EQ(kit::read_file(both.to), "kept");
}

// The time of the last access, in seconds since 1970, as the system's own
// tool tells it.
std::string time_of_access(const std::string& path) {
  return kit::run_process({"stat", "-c", "%X", path}).out;
}

TEST(zxplat, a_copied_time_is_that_of_the_access_as_well) {
  if (kit::on_windows()) GTEST_SKIP() << "there is no tool that tells it";
  const OldAndNew both;
  const std::string written =
      kit::run_process({"stat", "-c", "%Y", both.from}).out;
  ASSERT_NE(time_of_access(both.to), written);
  EXPECT_TRUE(zxplat::copy_time(both.from, both.to));
  EXPECT_EQ(time_of_access(both.to), written);
}

TEST(zxplat, copied_permissions_are_the_permissions_alone) {
  const OldAndNew both;
  make_read_only(both.from);
  const auto before = fs::last_write_time(both.to);
  EXPECT_TRUE(
      zxplat::copy_permissions(both.dir.file("FROM"), both.dir.file("TO")))
      << last_error();
  EXPECT_EQ(fs::status(both.to).permissions(),
            fs::status(both.from).permissions());
  EXPECT_EQ(fs::last_write_time(both.to), before);
  EXPECT_EQ(kit::read_file(both.to), "kept");
}

TEST(zxplat, a_copied_permission_lets_a_file_be_deleted_again) {
  const OldAndNew both;
  make_read_only(both.to);
  EXPECT_TRUE(zxplat::copy_permissions(both.from, both.to)) << last_error();
  EXPECT_TRUE(files.remove(both.to)) << last_error();
}

TEST(zxplat, natively_the_three_special_bits_are_not_copied) {
  if (kit::on_windows()) GTEST_SKIP() << "there are none";
  const OldAndNew both;
  fs::permissions(both.from, fs::perms::set_uid | fs::perms::set_gid |
                                 fs::perms::sticky_bit | fs::perms::owner_all |
                                 fs::perms::others_read);
  EXPECT_TRUE(zxplat::copy_permissions(both.from, both.to));
  EXPECT_EQ(fs::status(both.to).permissions(),
            fs::perms::owner_all | fs::perms::others_read);
}

TEST(zxplat, time_and_permissions_need_two_files) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  for (const auto call : {zxplat::copy_time, zxplat::copy_permissions}) {
    EXPECT_FALSE(call(dir.file("a"), dir.file("b")));
    EXPECT_EQ(last_error(), zxplat::k_err_not_found);
    EXPECT_FALSE(call(dir.file("b"), dir.file("a")));
    EXPECT_EQ(last_error(), zxplat::k_err_not_found);
    EXPECT_FALSE(call(dir.file("no\\b"), dir.file("a")));
    EXPECT_EQ(last_error(), zxplat::k_err_path_not_found);
  }
}

// --------------------------------------------------------------- folders --

using FolderCall = std::size_t (*)(std::span<char>);

// Expects the text from any buffer that is large enough, and nothing stored
// in one that is not.
void expect_text(FolderCall call, const std::string& expected) {
  const std::size_t length = expected.size();
  for (std::size_t size = 0; size < length + 3; ++size) {
    std::string out(size, '#');
    EXPECT_EQ(call(out), length) << size;
    if (size <= length) {
      EXPECT_EQ(out, std::string(size, '#'));
    } else {
      EXPECT_STREQ(out.c_str(), expected.c_str());
      EXPECT_EQ(out.substr(length + 1), std::string(size - length - 1, '#'));
    }
  }
}

TEST(zxplat, the_working_directory_is_in_win32_form) {
  const TempDir dir;
  const WorkingIn there(dir.path());
  const std::string expected = with_slashes(fs::current_path().string(), '\\');
  expect_text(zxplat::current_directory, expected);
  EXPECT_EQ(zxplat::kind_of(expected), NameKind::directory);
}

TEST(zxplat, the_temporary_directory_ends_in_a_backslash) {
  char text[1000];
  const std::size_t length = zxplat::temp_directory(text);
  ASSERT_LT(length, sizeof text);
  ASSERT_GT(length, 0u);
  EXPECT_EQ(text[length - 1], '\\');
  EXPECT_EQ(text[length], '\0');
  EXPECT_EQ(std::string(text).find('/'), std::string::npos);
  EXPECT_EQ(zxplat::kind_of(text), NameKind::directory);
  expect_text(zxplat::temp_directory, text);
}

// Gives variables their old values back at the end of the block.
class Variables {
 public:
  explicit Variables(const std::vector<std::string>& wanted) {
    for (const std::string& name : wanted) {
      const char* value = std::getenv(name.c_str());
      before.emplace_back(name, value != nullptr ? value : "");
    }
  }
  Variables(const Variables&) = delete;
  Variables& operator=(const Variables&) = delete;
  ~Variables() {
    for (const auto& [name, value] : before) {
      kit::set_variable(name, value.empty() ? nullptr : value.c_str());
    }
  }

  void clear() const {
    for (const auto& entry : before) {
      kit::set_variable(entry.first, nullptr);
    }
  }

 private:
  std::vector<std::pair<std::string, std::string>> before;
};

TEST(zxplat, the_temporary_directory_is_named_by_the_environment) {
  if (kit::on_windows()) GTEST_SKIP() << "the system has its own rules";
  const Variables variables({"TMPDIR", "TMP", "TEMP"});
  variables.clear();
  expect_text(zxplat::temp_directory, "\\tmp\\");
  kit::set_variable("TEMP", "/a/b");
  expect_text(zxplat::temp_directory, "\\a\\b\\");
  kit::set_variable("TMP", "c\\d/");
  expect_text(zxplat::temp_directory, "c\\d\\");
  kit::set_variable("TMPDIR", "/");
  expect_text(zxplat::temp_directory, "\\");
  kit::set_variable("TMPDIR", "");
  expect_text(zxplat::temp_directory, "c\\d\\");
}

// --------------------------------------------------------------- process --

TEST(zxplat, the_clock_counts_seconds_since_1970) {
  using std::chrono::system_clock;
  const std::int64_t before = system_clock::to_time_t(system_clock::now());
  const std::int64_t now = zxplat::process.clock();
  const std::int64_t after = system_clock::to_time_t(system_clock::now());
  EXPECT_GE(now, before - 1);
  EXPECT_LE(now, after + 1);
}

TEST(zxplat, sleeping_lets_the_ticks_advance) {
  // Some systems count in steps of 16 milliseconds.
  const std::uint32_t before = zxplat::process.ticks();
  zxplat::process.sleep(60);
  const std::uint32_t passed = zxplat::process.ticks() - before;
  EXPECT_GE(passed, 44u);
  EXPECT_LT(passed, 30'000u);
}

// A test that runs itself again as a process of its own finds its folder
// here; in the test itself it is empty.
constexpr const char* k_child_variable = "ZXPLAT_TEST_FOLDER";

std::string child_folder() {
  const char* folder = std::getenv(k_child_variable);
  return folder != nullptr ? folder : "";
}

kit::ProcessResult run_as_child(const TempDir& dir,
                                kit::ProcessOptions options = {}) {
  const auto* test = testing::UnitTest::GetInstance()->current_test_info();
  const std::string name =
      std::string(test->test_suite_name()) + "." + test->name();
  options.variables.emplace_back(k_child_variable, dir.path());
  options.variables.emplace_back("GTEST_FILTER", name);
  return kit::run_process({kit::self_path()}, options);
}

void leave_a_note() {
  kit::write_file(child_folder() + "/note", "exit handlers ran");
}

TEST(zxplat, exit_ends_the_process_through_its_exit_handlers) {
  if (!child_folder().empty()) {
    std::atexit(leave_a_note);
    zxplat::process.exit(77);
  }
  const TempDir dir;
  EXPECT_EQ(run_as_child(dir).exit_code, 77);
  EXPECT_EQ(kit::read_file(dir.file("note")), "exit handlers ran");
}

TEST(zxplat, exit_at_once_ends_the_process_without_exit_handlers) {
  if (!child_folder().empty()) {
    std::atexit(leave_a_note);
    zxplat::process.exit_at_once(78);
  }
  const TempDir dir;
  EXPECT_EQ(run_as_child(dir).exit_code, 78);
  EXPECT_FALSE(fs::exists(dir.file("note")));
}

TEST(zxplat, without_a_debugger_a_break_does_nothing) {
  set_last_error(k_untouched);
  zxplat::process.debug_break();
  EXPECT_EQ(last_error(), k_untouched);
}

// The child's part: no file comes to stand under the number of a stream, and
// what is said there is lost.
void write_without_streams() {
  zxplat::prepare_process();
  const Open file(child_folder() + "/data", OpenMode::create);
  EXPECT_GT(file.fd, zxplat::k_stderr_fd);
  for (const Fd fd : {0, 1, 2}) {
    EXPECT_EQ(files.write(fd, "lost", 4), 4) << fd << ' ' << last_error();
  }
  char byte;
  EXPECT_EQ(files.read(zxplat::k_stdin_fd, &byte, 1), 0);
  EXPECT_EQ(file.write("data"), 4);
}

TEST(zxplat, streams_that_the_process_lacks_become_the_null_device) {
  if (!child_folder().empty()) return write_without_streams();
  const TempDir dir;
  kit::ProcessOptions options;
  options.missing = kit::k_no_input | kit::k_no_output | kit::k_no_errors;
  const kit::ProcessResult result = run_as_child(dir, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out + result.err, "");
  EXPECT_EQ(kit::read_file(dir.file("data")), "data");
}

// The child's part: input to output, byte by byte.
void copy_streams() {
  zxplat::prepare_process();
  EXPECT_TRUE(zxplat::set_binary(zxplat::k_stdin_fd));
  EXPECT_TRUE(zxplat::set_binary(zxplat::k_stderr_fd));
  EXPECT_FALSE(zxplat::is_terminal(zxplat::k_stdin_fd));
  EXPECT_FALSE(zxplat::is_terminal(zxplat::k_stderr_fd));
  char bytes[64];
  std::int64_t count;
  while ((count = files.read(0, bytes, sizeof bytes)) > 0) {
    files.write(2, bytes, static_cast<std::size_t>(count));
  }
}

TEST(zxplat, standard_streams_carry_every_byte) {
  if (!child_folder().empty()) return copy_streams();
  const TempDir dir;
  kit::ProcessOptions options;
  for (int i = 0; i < 1000 * 256; ++i) {
    options.input += static_cast<char>(i);
  }
  const kit::ProcessResult result = run_as_child(dir, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_TRUE(result.err == options.input) << result.err.size();
}

// The child's part: the number of the open file means nothing there.
void look_for_the_file() {
  const std::string number = kit::read_file(child_folder() + "/fd");
  EXPECT_EQ(files.seek(std::stoi(number), 0, Whence::current), -1);
  EXPECT_EQ(last_error(), zxplat::k_err_bad_handle);
}

TEST(zxplat, a_child_process_does_not_inherit_open_files) {
  if (!child_folder().empty()) return look_for_the_file();
  const TempDir dir;
  const Open file(dir.file("a"), OpenMode::create);
  kit::write_file(dir.file("fd"), std::to_string(file.fd));
  const kit::ProcessResult result = run_as_child(dir);
  EXPECT_EQ(result.exit_code, 0) << result.out;
}

// ----------------------------------------------------------------- boxes --

constexpr const char* k_box_variable = "ZX_BOX_OUT";

// What boxes and last words leave in the file that the variable names.
std::string boxes_in_file(void (*action)()) {
  const TempDir dir;
  const Variables variables({k_box_variable});
  kit::set_variable(k_box_variable, dir.file("boxes").c_str());
  action();
  return kit::read_file(dir.file("boxes"));
}

TEST(zxplat, a_box_is_written_as_caption_style_and_text) {
  EXPECT_EQ(boxes_in_file(
                [] { zxplat::process.message_box("text", "caption", 0x1010); }),
            "caption\n0x1010\ntext\n");
  EXPECT_EQ(boxes_in_file([] { zxplat::process.message_box("", "", 0); }),
            "\n0x0000\n\n");
}

TEST(zxplat, the_style_of_a_box_is_in_hexadecimal) {
  EXPECT_EQ(boxes_in_file([] {
              for (const std::uint32_t style :
                   {0U, 1U, 0xABCU, 0xFFFFU, 0x10000U, 0x12345678U, ~0U})
                zxplat::process.message_box("t", "c", style);
            }),
            "c\n0x0000\nt\nc\n0x0001\nt\nc\n0x0abc\nt\nc\n0xffff\nt\n"
            "c\n0x10000\nt\nc\n0x12345678\nt\nc\n0xffffffff\nt\n");
}

TEST(zxplat, boxes_and_last_words_are_added_to_the_file) {
  EXPECT_EQ(boxes_in_file([] {
              zxplat::process.last_words("last words");
              zxplat::process.message_box("a\nb\r\n\xF9", "%s%n", 0x10);
              zxplat::process.last_words("");
              zxplat::process.last_words("more\n");
            }),
            "last words%s%n\n0x0010\na\nb\r\n\xF9\nmore\n");
}

TEST(zxplat, a_long_text_of_a_box_is_written_in_bounds) {
  static const std::string text(100'000, 'x');
  const std::string written = boxes_in_file(
      [] { zxplat::process.message_box(text.c_str(), "caption", 0x1010); });
  const std::string head = "caption\n0x1010\n";
  EXPECT_TRUE(written.starts_with(head));
  EXPECT_GT(written.size(), 17'000U);  // the longest message of a failure
  EXPECT_LE(written.size(), head.size() + text.size() + 1);
  EXPECT_EQ(written.find_first_not_of("x\n", head.size()), written.npos);
  EXPECT_EQ(boxes_in_file([] { zxplat::process.last_words(text.c_str()); }),
            text);
}

ZX_CASE(zxplat_says_box_and_last_words) {
  zxplat::prepare_process();
  zxplat::process.message_box("text", "caption", 0x1010);
  zxplat::process.last_words("last words");
  return 3;
}

TEST(zxplat, boxes_can_be_sent_to_standard_error) {
  kit::ProcessOptions options;
  options.variables = {{k_box_variable, "-"}};
  const kit::ProcessResult result =
      kit::run_case("zxplat_says_box_and_last_words", {}, options);
  EXPECT_EQ(result.exit_code, 3);
  EXPECT_EQ(result.err, "caption\n0x1010\ntext\nlast words");
  EXPECT_EQ(result.out, "");
}

TEST(zxplat, boxes_are_written_to_standard_error_natively) {
  if (kit::on_windows()) GTEST_SKIP() << "they would be shown";
  const TempDir dir;
  kit::ProcessOptions unset;
  unset.removed_variables = {k_box_variable};
  kit::ProcessOptions empty;
  empty.variables = {{k_box_variable, ""}};
  kit::ProcessOptions not_to_be_opened;
  not_to_be_opened.variables = {{k_box_variable, dir.file("no\\box")}};
  for (const auto& options : {unset, empty, not_to_be_opened}) {
    const kit::ProcessResult result =
        kit::run_case("zxplat_says_box_and_last_words", {}, options);
    EXPECT_EQ(result.exit_code, 3);
    EXPECT_EQ(result.err, "caption\n0x1010\ntext\nlast words");
    EXPECT_EQ(result.out, "");
  }
}

// ------------------------------------------------------ debugger output --

constexpr const char* k_debug_variable = "ZX_DEBUG_OUT";

TEST(zxplat, texts_for_the_debugger_are_added_to_the_file) {
  const TempDir dir;
  const Variables variables({k_debug_variable, k_box_variable});
  kit::set_variable(k_debug_variable, dir.file("texts").c_str());
  kit::set_variable(k_box_variable, dir.file("boxes").c_str());
  for (const char* text : {"one", "", "two\n", "a\r\n\xF9%s%n"})
    zxplat::process.debug_output(text);
  EXPECT_EQ(kit::read_file(dir.file("texts")), "onetwo\na\r\n\xF9%s%n");
  EXPECT_EQ(kit::names_in(dir.path()), Names{"texts"});
}

TEST(zxplat, a_long_text_for_the_debugger_is_written_whole) {
  const TempDir dir;
  const Variables variables({k_debug_variable});
  kit::set_variable(k_debug_variable, dir.file("texts").c_str());
  const std::string text(100'000, 'x');
  zxplat::process.debug_output(text.c_str());
  EXPECT_TRUE(kit::read_file(dir.file("texts")) == text);
}

ZX_CASE(zxplat_tells_the_debugger) {
  zxplat::prepare_process();
  zxplat::process.debug_output("text\n");
  zxplat::process.debug_output("more");
  return 3;
}

// What a process that tells the debugger two texts shows.
void expect_debugger_told(const kit::ProcessOptions& options,
                          const std::string& errors) {
  const kit::ProcessResult result =
      kit::run_case("zxplat_tells_the_debugger", {}, options);
  EXPECT_EQ(result.exit_code, 3);
  EXPECT_EQ(result.err, errors);
  EXPECT_EQ(result.out, "");
}

TEST(zxplat, texts_for_the_debugger_can_be_sent_to_standard_error) {
  kit::ProcessOptions options;
  options.variables = {{k_debug_variable, "-"}};
  expect_debugger_told(options, "text\nmore");
}

TEST(zxplat, texts_for_the_debugger_are_nowhere_without_a_place) {
  const TempDir dir;
  kit::ProcessOptions unset;
  unset.removed_variables = {k_debug_variable};
  kit::ProcessOptions empty;
  empty.variables = {{k_debug_variable, ""}};
  kit::ProcessOptions not_to_be_opened;
  not_to_be_opened.variables = {{k_debug_variable, dir.file("no\\texts")}};
  for (auto options : {unset, empty, not_to_be_opened}) {
    options.directory = dir.path();
    expect_debugger_told(options, "");
  }
  EXPECT_EQ(kit::names_in(dir.path()), Names{});
}

// ----------------------------------------------------------- environment --

ZX_CASE(zxplat_shows_variables) {
  for (int i = 1; i < argc; ++i) {
    const char* value = zxplat::environment_variable(argv[i]);
    std::string shown = "none";
    if (value != nullptr) shown = std::string("'") + value + "'";
    zxplat::write_all(zxplat::k_stdout_fd, shown + ";");
  }
  return 0;
}

TEST(zxplat, the_environment_has_values_for_names) {
  kit::ProcessOptions options;
  options.variables = {{"ZX_TEST_ONE", "a b=c %s\xF9"},
                       {"ZX_TEST_ONE_MORE", "longer"}};
  options.removed_variables = {"ZX_TEST_TWO"};
  const kit::ProcessResult result = kit::run_case(
      "zxplat_shows_variables",
      {"ZX_TEST_ONE", "ZX_TEST_ONE_MORE", "ZX_TEST_TWO", "ZX_TEST_ON", ""},
      options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "'a b=c %s\xF9';'longer';none;none;none;");
}

TEST(zxplat, a_changed_environment_is_seen) {
  constexpr const char* k_name = "ZX_TEST_CHANGED";
  const Variables variables({k_name});
  EXPECT_EQ(zxplat::environment_variable(k_name), nullptr);
  for (const char* value : {"x", "another, longer value"}) {
    kit::set_variable(k_name, value);
    EXPECT_STREQ(zxplat::environment_variable(k_name), value);
  }
  kit::set_variable(k_name, nullptr);
  EXPECT_EQ(zxplat::environment_variable(k_name), nullptr);
}

TEST(zxplat, no_system_of_these_days_is_windows_95) {
  EXPECT_FALSE(zxplat::process.is_windows_95());
  EXPECT_FALSE(zxplat::system_process.is_windows_95());
}

// ---------------------------------------------------------------- faults --

// Functions that end in a fault, and where their frame is then.  Sanitizers
// would be ahead of the fault, and the compiler may know of none: it is to
// note the frame behind it as well, so that it is still there.
using Faulty = void (*)();
volatile std::uintptr_t faulty_frame = 0;
volatile int zero = 0;
volatile int hundred = 100;
int* volatile nowhere = nullptr;

#define FAULTY                                           \
  [[gnu::noinline, gnu::noipa, gnu::no_sanitize_address, \
    gnu::no_sanitize_undefined]] void
#define NOTE_FRAME() \
  (faulty_frame = reinterpret_cast<std::uintptr_t>(__builtin_frame_address(0)))

FAULTY write_to_nowhere() {
  NOTE_FRAME();
  *static_cast<volatile int*>(nowhere) = 1;
  NOTE_FRAME();
}

FAULTY read_from_nowhere() {
  NOTE_FRAME();
  zero = *static_cast<volatile int*>(nowhere);
  NOTE_FRAME();
}

FAULTY run_into_a_trap() {
  NOTE_FRAME();
  __builtin_trap();
}

FAULTY divide_by_zero() {
  NOTE_FRAME();
  zero = hundred / zero;
  NOTE_FRAME();
}

// The frame of a fault in the depth is another one each time.
FAULTY fill_the_stack() {
  volatile char room[2000];
  room[0] = 1;
  NOTE_FRAME();
  if (zero == 0) fill_the_stack();
  room[1] = room[0];
}

struct FaultRow {
  const char* name;
  Faulty action;
  int signal;
  int sub_code;
};
constexpr FaultRow k_faults[] = {
    {"write", write_to_nowhere, 11, 1}, {"read", read_from_nowhere, 11, 1},
    {"trap", run_into_a_trap, 4, 2},    {"division", divide_by_zero, 8, 1},
    {"stack", fill_the_stack, 11, 1},
};

Faulty faulty_function = nullptr;

void say(const std::string& text) {
  zxplat::write_all(zxplat::k_stdout_fd, text);
}

// Tells the fault, and whether its place is the one that it must have.
void tell(const zxplat::Fault& fault) {
  const auto start = reinterpret_cast<std::uintptr_t>(faulty_function);
  constexpr std::uintptr_t k_most = 500;  // bytes of code
  const bool is_there =
      fault.instruction > start && fault.instruction < start + k_most;
  say(std::to_string(fault.signal) + " " + std::to_string(fault.sub_code) +
      (is_there ? " there" : " elsewhere") +
      (fault.frame == faulty_frame ? " in its frame" : " in another frame"));
}

void tell_and_end(const zxplat::Fault& fault) {
  tell(fault);
  zxplat::process.exit_at_once(40);
}

void tell_and_fault(const zxplat::Fault& fault) {
  tell(fault);
  faulty_function();
  say(" went on in the handler");
}

// Does what the first argument names, with the handler of the second.
ZX_CASE(zxplat_faults) {
  zxplat::prepare_process();
  zxplat::catch_faults(argv[2] == "ends"sv         ? tell_and_end
                       : argv[2] == "comes back"sv ? tell
                                                   : tell_and_fault);
  for (const FaultRow& row : k_faults)
    if (argv[1] == std::string_view(row.name)) faulty_function = row.action;
  faulty_function();
  say(" went on");
  return 0;
}

std::string told(const FaultRow& row) {
  return std::to_string(row.signal) + " " + std::to_string(row.sub_code) +
         " there in its frame";
}

TEST(zxplat, faults_are_reported_with_their_kind_and_their_place) {
  for (const FaultRow& row : k_faults) {
    SCOPED_TRACE(row.name);
    const kit::ProcessResult result =
        kit::run_case("zxplat_faults", {row.name, "ends"});
    EXPECT_EQ(result.exit_code, 40);
    if (row.action == fill_the_stack) {
      // The fault may come ahead of the noting of the frame.
      EXPECT_TRUE(result.out.starts_with("11 1 there in ")) << result.out;
    } else {
      EXPECT_EQ(result.out, told(row));
    }
  }
}

// What the process ends with is the system's own affair.
TEST(zxplat, a_handler_that_comes_back_leaves_the_fault_to_the_system) {
  for (const FaultRow& row : k_faults) {
    if (row.action == fill_the_stack) continue;
    SCOPED_TRACE(row.name);
    const kit::ProcessResult result =
        kit::run_case("zxplat_faults", {row.name, "comes back"});
    EXPECT_FALSE(result.timed_out);
    EXPECT_NE(result.exit_code, 0);
    if (!kit::on_windows()) {
      EXPECT_EQ(result.exit_code, -row.signal);
    }
    EXPECT_EQ(result.out, told(row));
  }
}

TEST(zxplat, a_fault_of_the_handler_itself_ends_the_process) {
  for (const FaultRow& row : k_faults) {
    if (row.action == fill_the_stack) continue;
    SCOPED_TRACE(row.name);
    const kit::ProcessResult result =
        kit::run_case("zxplat_faults", {row.name, "faults"});
    EXPECT_FALSE(result.timed_out);
    EXPECT_NE(result.exit_code, 0);
    if (!kit::on_windows()) {
      EXPECT_EQ(result.exit_code, -row.signal);
    }
    EXPECT_EQ(result.out, told(row));
  }
}

// ---------------------------------------------------------------- memory --

std::uintptr_t address_of(const void* place) {
  return reinterpret_cast<std::uintptr_t>(place);
}

TEST(zxplat, memory_is_read_as_it_is) {
  for (const std::size_t size :
       {1U, 2U, 3U, 4U, 8U, 4095U, 4096U, 4097U, 65'536U, 1'000'001U}) {
    for (const std::size_t shift : {0U, 1U, 3U, 4000U}) {
      SCOPED_TRACE(testing::Message() << size << " at " << shift);
      std::string from(shift + size, '\0');
      for (std::size_t i = 0; i < from.size(); ++i)
        from[i] = static_cast<char>(i * 7 + i / 256);
      std::string out(size + 2, '#');
      ASSERT_TRUE(zxplat::read_memory(address_of(from.data() + shift),
                                      out.data() + 1, size));
      ASSERT_TRUE(out == "#" + from.substr(shift) + "#");
    }
  }
}

const char k_constant[] = "read-only";

TEST(zxplat, constants_and_code_can_be_told_from_nothing) {
  char out[sizeof k_constant];
  EXPECT_TRUE(zxplat::read_memory(address_of(k_constant), out, sizeof out));
  EXPECT_STREQ(out, "read-only");
  char byte = 'x';
  EXPECT_TRUE(zxplat::read_memory(address_of(&byte), out, 1));
  EXPECT_EQ(out[0], 'x');
}

TEST(zxplat, what_is_not_there_cannot_be_read) {
  constexpr std::uintptr_t k_last = ~std::uintptr_t{0};
  std::vector<char> out(100'000);
  for (const std::uintptr_t from :
       {std::uintptr_t{0}, std::uintptr_t{1}, std::uintptr_t{16},
        std::uintptr_t{4095}, k_last, k_last - 7, k_last - 4096}) {
    for (const std::size_t size : {std::size_t{1}, std::size_t{8},
                                   std::size_t{4096}, std::size_t{100'000}})
      EXPECT_FALSE(zxplat::read_memory(from, out.data(), size))
          << from << ' ' << size;
  }
}

TEST(zxplat, memory_is_read_whole_or_not_at_all) {
  const kit::GuardedMemory memory(200'000);
  const auto size = static_cast<std::size_t>(memory.end() - memory.begin());
  std::fill(memory.begin(), memory.end(), 'x');
  std::string out(size + 1, '#');
  EXPECT_TRUE(
      zxplat::read_memory(address_of(memory.begin()), out.data(), size));
  EXPECT_TRUE(out == std::string(size, 'x') + '#');
  EXPECT_FALSE(
      zxplat::read_memory(address_of(memory.begin()), out.data(), size + 1));
  for (std::size_t i = 1; i <= 5000; i += i < 40 ? 1 : 31) {
    const std::uintptr_t from = address_of(memory.end()) - i;
    ASSERT_TRUE(zxplat::read_memory(from, out.data(), i)) << i;
    ASSERT_FALSE(zxplat::read_memory(from, out.data(), i + 1)) << i;
    ASSERT_FALSE(zxplat::read_memory(from + i, out.data(), 1)) << i;
  }
}

TEST(zxplat, reading_memory_leaves_the_last_error_alone) {
  char byte = 'x';
  char out;
  set_last_error(k_untouched);
  EXPECT_TRUE(zxplat::read_memory(address_of(&byte), &out, 1));
  EXPECT_EQ(last_error(), k_untouched);
}

// ------------------------------------------------------------------ size --

TEST(zxplat, a_file_is_cut_and_widened_by_zeros_and_the_position_stays) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abcdef");
  const Open file(dir.file("a"), OpenMode::read_write);
  EXPECT_EQ(files.seek(file.fd, 4, Whence::start), 4);
  const struct {
    std::int64_t size;
    std::string_view bytes;
  } rows[] = {
      {6, "abcdef"}, {3, "abc"}, {5, "abc\0\0"sv}, {0, ""}, {2, "\0\0"sv}};
  for (const auto& row : rows) {
    EXPECT_TRUE(files.set_size(file.fd, row.size)) << last_error();
    EXPECT_EQ(files.size(file.fd), row.size);
    EXPECT_EQ(files.seek(file.fd, 0, Whence::current), 4);
    EXPECT_EQ(kit::read_file(dir.file("a")), row.bytes);
  }
  EXPECT_TRUE(files.set_size(file.fd, 5'000'000'000));
  EXPECT_EQ(files.size(file.fd), 5'000'000'000);
}

TEST(zxplat, setting_a_size_needs_a_descriptor_for_writing) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abcdef");
  const Open file(dir.file("a"), OpenMode::read);
  set_last_error(k_untouched);
  EXPECT_FALSE(files.set_size(file.fd, 3));
  EXPECT_EQ(last_error(), zxplat::k_err_denied);
  EXPECT_EQ(kit::read_file(dir.file("a")), "abcdef");
  for (const OpenMode mode : k_overwriting_modes) {
    const Open other(dir.file("a"), mode);
    EXPECT_TRUE(files.set_size(other.fd, 3)) << last_error();
    EXPECT_EQ(kit::read_file(dir.file("a")).size(), 3U);
  }
}

TEST(zxplat, a_negative_size_is_refused) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "abcdef");
  const Open file(dir.file("a"), OpenMode::read_write);
  for (const std::int64_t size : {std::int64_t{-1}, INT64_MIN}) {
    set_last_error(k_untouched);
    EXPECT_FALSE(files.set_size(file.fd, size));
    EXPECT_EQ(last_error(), zxplat::k_err_bad_parameter);
  }
  EXPECT_EQ(kit::read_file(dir.file("a")), "abcdef");
}

// ----------------------------------------------------------------- locks --

void expect_locked(Fd fd, std::int64_t start, std::int64_t size) {
  set_last_error(k_untouched);
  EXPECT_FALSE(files.lock(fd, start, size)) << start << ", " << size;
  EXPECT_EQ(last_error(), zxplat::k_err_lock);
}

TEST(zxplat, descriptors_of_one_process_lock_each_other_out) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "0123456789");
  const Open first(dir.file("a"), OpenMode::read_write);
  const Open second(dir.file("a"), OpenMode::read_write);
  EXPECT_TRUE(files.lock(first.fd, 2, 3)) << last_error();
  expect_locked(second.fd, 2, 3);
  expect_locked(second.fd, 0, 3);
  expect_locked(second.fd, 4, 100);
  expect_locked(second.fd, 3, 1);
  EXPECT_TRUE(files.lock(second.fd, 0, 2)) << last_error();
  EXPECT_TRUE(files.lock(second.fd, 5, 1)) << last_error();
  EXPECT_TRUE(files.unlock(first.fd, 2, 3)) << last_error();
  EXPECT_TRUE(files.lock(second.fd, 2, 3)) << last_error();
}

TEST(zxplat, bytes_that_do_not_exist_are_locked_as_well) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "");
  const Open first(dir.file("a"), OpenMode::read_write);
  const Open second(dir.file("a"), OpenMode::read_write);
  for (const std::int64_t start : {100LL, 0x7FFF'FFFFLL, 0x1'0000'0005LL}) {
    EXPECT_TRUE(files.lock(first.fd, start, 1)) << last_error();
    expect_locked(second.fd, start, 1);
    EXPECT_TRUE(files.lock(second.fd, start + 1, 1)) << last_error();
    EXPECT_TRUE(files.unlock(second.fd, start + 1, 1)) << last_error();
  }
}

TEST(zxplat, closing_one_descriptor_unlocks_what_it_locked_alone) {
  const TempDir dir;
  kit::write_file(dir.file("a"), "0123456789");
  const Open first(dir.file("a"), OpenMode::read_write);
  const Open asking(dir.file("a"), OpenMode::read_write);
  EXPECT_TRUE(files.lock(first.fd, 0, 1));
  {
    const Open second(dir.file("a"), OpenMode::read_write);
    EXPECT_TRUE(files.lock(second.fd, 5, 1));
    expect_locked(asking.fd, 5, 1);
  }
  EXPECT_TRUE(files.lock(asking.fd, 5, 1)) << last_error();
  expect_locked(asking.fd, 0, 1);
}

TEST(zxplat, a_native_lock_needs_a_descriptor_for_writing) {
  if (kit::on_windows()) GTEST_SKIP() << "any descriptor will do";
  const TempDir dir;
  kit::write_file(dir.file("a"), "0123456789");
  const Open file(dir.file("a"), OpenMode::read);
  set_last_error(k_untouched);
  EXPECT_FALSE(files.lock(file.fd, 0, 1));
  EXPECT_EQ(last_error(), zxplat::k_err_denied);
  set_last_error(k_untouched);
  EXPECT_FALSE(files.unlock(file.fd, 0, 1));
  EXPECT_EQ(last_error(), zxplat::k_err_denied);
}

// The child's part: bytes 2 to 4 are held by its parent.
void meet_a_lock() {
  const Open file(child_folder() + "/a", OpenMode::read_write);
  expect_locked(file.fd, 2, 3);
  expect_locked(file.fd, 4, 1);
  EXPECT_TRUE(files.lock(file.fd, 5, 5)) << last_error();
  // The end of the process unlocks.
}

TEST(zxplat, a_lock_is_met_by_another_process_and_ends_with_it) {
  if (!child_folder().empty()) return meet_a_lock();
  const TempDir dir;
  kit::write_file(dir.file("a"), "0123456789");
  const Open file(dir.file("a"), OpenMode::read_write);
  EXPECT_TRUE(files.lock(file.fd, 2, 3)) << last_error();
  const kit::ProcessResult result = run_as_child(dir);
  EXPECT_EQ(result.exit_code, 0) << result.out;
  EXPECT_TRUE(files.lock(file.fd, 5, 5)) << last_error();
}

// ------------------------------------------------------- kinds of streams --

TEST(zxplat, a_descriptor_has_a_stream_behind_it_or_none) {
  const TempDir dir;
  const kit::Pipe pipe = kit::make_pipe();
  set_last_error(k_untouched);
  {
    const Open file(dir.file("a"), OpenMode::create);
    const Open null("nul", OpenMode::read_write);
    for (const Fd fd : {file.fd, null.fd, pipe.reader, pipe.writer})
      EXPECT_TRUE(zxplat::has_stream(fd)) << fd;
  }
  files.close(pipe.reader);
  files.close(pipe.writer);
  for (const Fd fd : {pipe.reader, 999, k_no_fd})
    EXPECT_FALSE(zxplat::has_stream(fd)) << fd;
  EXPECT_EQ(last_error(), k_untouched);
}

TEST(zxplat, text_is_translated_on_windows_alone) {
  const TempDir dir;
  const Open file(dir.file("a"), OpenMode::create);
  EXPECT_TRUE(files.set_mode(file.fd, zxplat::StreamMode::text));
  EXPECT_EQ(file.write("a\n"), 2);
  EXPECT_TRUE(files.set_mode(file.fd, zxplat::StreamMode::binary));
  EXPECT_EQ(file.write("b\n"), 2);
  EXPECT_EQ(kit::read_file(dir.file("a")),
            kit::on_windows() ? "a\r\nb\n" : "a\nb\n");
}

// ---------------------------------------------------------------- tables --

TEST(zxplat, the_tables_start_as_the_systems_own_calls) {
  EXPECT_EQ(std::memcmp(&files, &zxplat::system_files, sizeof files), 0);
  EXPECT_EQ(std::memcmp(&zxplat::process, &zxplat::system_process,
                        sizeof zxplat::process),
            0);
}

int g_slept = 0;

TEST(zxplat, a_test_can_replace_entries_of_the_tables) {
  const TempDir dir;
  g_slept = 0;
  files.remove = [](std::string_view) {
    set_last_error(zxplat::k_err_sharing);
    return false;
  };
  zxplat::process.sleep = [](std::uint32_t milliseconds) {
    g_slept += static_cast<int>(milliseconds);
  };
  expect_remove_fails(dir.file("a"), zxplat::k_err_sharing);
  zxplat::process.sleep(1'000'000);
  EXPECT_EQ(g_slept, 1'000'000);

  files = zxplat::system_files;
  zxplat::process = zxplat::system_process;
  expect_remove_fails(dir.file("a"), zxplat::k_err_not_found);
}

}  // namespace
