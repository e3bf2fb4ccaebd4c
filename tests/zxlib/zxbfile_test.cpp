// zxbfile_test.cpp - the file class: each operation in success and in each
// of its failures, with the whole messages; names; closed and open objects;
// what is left behind a dropped failure; random operations against a model of
// the file.
// Tests zxlib/zxbfile.h, zxbfile.cpp and zxbfile_text.cpp.
#include "zxbfile.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <memory>
#include <random>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "file_model.h"
#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/faults.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "zxmainf.h"

namespace {

namespace fs = std::filesystem;

using kit::Call;
using kit::Faults;
using kit::line_of;
using kit::read_file;
using kit::TempDir;
using kit::write_file;

constexpr BailDetail k_detail(7, "context");

void expect_failure(const std::function<void()>& statement, int number,
                    const std::string& message, const std::string& text,
                    const BailDetail& detail = no_detail) {
  const std::string added = detail.number != 0 ? " (7: context)" : "";
  EXPECT_FAILURE(statement(), std::to_string(number) + ": " + message + added,
                 line_of(number, text, detail));
}

// Runs a statement without and with a detail: `run` gets the detail.
void expect_failure_with_details(
    const std::function<void(const BailDetail&)>& run, int number,
    const std::string& message, const std::string& text) {
  for (const BailDetail& detail : {no_detail, k_detail})
    expect_failure([&] { run(detail); }, number, message, text, detail);
}

std::string quoted(const std::string& text) { return "'" + text + "'"; }

using kit::text_of;

// A folder with a file of ten bytes.
class zxbfile : public testing::Test {
 protected:
  zxbfile() { write_file(path, k_bytes); }

  std::string bytes() const { return read_file(path); }

  // Up to `size` bytes from the position on, as a read with a count gives
  // them.
  static std::string read(zxBFile& file, std::int32_t size) {
    std::string bytes(static_cast<std::size_t>(size), '?');
    std::int32_t got = -1;
    const bool read = file.read(bytes.data(), size, &got);
    EXPECT_EQ(read, got == size || got > 0);
    bytes.resize(static_cast<std::size_t>(got));
    return bytes;
  }

  static void write(zxBFile& file, std::string_view text) {
    file.write(text.data(), static_cast<std::int32_t>(text.size()));
  }

  static constexpr std::string_view k_bytes = "0123456789";
  TempDir folder;
  const std::string path = folder.file("file");
  const std::string missing = folder.file("none");
  const zxStr name = path.c_str();
  const zxStr missing_name = missing.c_str();
};

// The ways of opening, in their try and their fatal forms.
struct Opening {
  const char* label;
  void (*open)(zxBFile& file, const zxStr& name);
  int already_open;  // the message of an object that is open
  const char* already_open_text;
};

constexpr Opening k_openings[] = {
    {"open", [](zxBFile& file, const zxStr& name) { file.open(name); }, 1009,
     "open: File '%' already open"},
    {"open_or_die",
     [](zxBFile& file, const zxStr& name) { file.open_or_die(name); }, 1009,
     "open: File '%' already open"},
    {"open_rw", [](zxBFile& file, const zxStr& name) { file.open_rw(name); },
     1005, "open_rw: File already open '%'"},
    {"try_create",
     [](zxBFile& file, const zxStr& name) { file.try_create(name); }, 1003,
     "create: File already open"},
    {"create", [](zxBFile& file, const zxStr& name) { file.create(name); },
     1003, "create: File already open"},
    {"create_new",
     [](zxBFile& file, const zxStr& name) { file.create_new(name); }, 1003,
     "create: File already open"},
    {"try_create_new",
     [](zxBFile& file, const zxStr& name) { file.try_create_new(name); }, 1003,
     "create: File already open"},
    {"try_create_private",
     [](zxBFile& file, const zxStr& name) { file.try_create_private(name); },
     1003, "create: File already open"},
    {"open_rw_or_die",
     [](zxBFile& file, const zxStr& name) { file.open_rw_or_die(name); }, 1005,
     "open_rw: File already open '%'"},
    {"try_append",
     [](zxBFile& file, const zxStr& name) { file.try_append(name); }, 1003,
     "create: File already open"},
    {"append", [](zxBFile& file, const zxStr& name) { file.append(name); },
     1003, "create: File already open"},
};

std::string filled(std::string text, const std::string& argument) {
  const std::size_t place = text.find('%');
  if (place != text.npos) text.replace(place, 1, argument);
  return text;
}

// ---- a closed object

TEST_F(zxbfile, a_fresh_object_is_closed_and_has_no_name) {
  const zxBFile file;
  EXPECT_FALSE(file.is_open());
  EXPECT_EQ(file.handle, nullptr);
  EXPECT_TRUE(file.name.is_empty());
  EXPECT_EQ(file.lines, 0);
}

TEST_F(zxbfile, a_closed_object_fails_each_operation_in_its_own_way) {
  zxBFile file;
  char room[4] = {};
  std::int32_t got = 99;
  using Detail = BailDetail;
  expect_failure_with_details(
      [&](const Detail& d) { file.read(room, 4, &got, d); }, 1014,
      "read: '' operation failed", "");
  EXPECT_EQ(got, 0);
  expect_failure_with_details(
      [&](const Detail& d) { file.read_all(room, 4, d); }, 1014,
      "read: '' operation failed", "");
  expect_failure_with_details([&](const Detail& d) { file.write("abc", 3, d); },
                              1016, "write: failed on ''", "");
  expect_failure_with_details(
      [&](const Detail& d) { file.write("abc", sizeof "ab", d); }, 1016,
      "write: failed on ''", "");
  expect_failure([&] { file.try_write("abc", 3); }, 1016, "write: failed on ''",
                 "");
  expect_failure([&] { file.puts("abc"); }, 1024, "puts: file not opened", "");
  zxStr text;
  expect_failure([&] { file.gets(text); }, 1025, "gets: file not opened", "");
  expect_failure([&] { file.read_str(text, 4); }, 1014,
                 "read: '' operation failed", "");
  expect_failure([&] { file.read_str_all(text, 4); }, 1014,
                 "read: '' operation failed", "");
  expect_failure([&] { file.get_name(); }, 1007, "get_name: File not open", "");
  expect_failure([&] { file.fastio(); }, 1011, "fastio: '' failed", "");
  expect_failure([&] { file.length(); }, 1018, "filelength: operation failed",
                 "");
  expect_failure_with_details([&](const Detail& d) { file.length(d); }, 1019,
                              "filelength: operation failed", "");
  expect_failure_with_details([&](const Detail& d) { file.chsize(5, d); }, 1023,
                              "chsize: operation failed", "");
  expect_failure_with_details([&](const Detail& d) { file.flush(d); }, 1020,
                              "flush: '' operation failed", "");
  expect_failure_with_details([&](const Detail& d) { file.lock(0, 1, d); },
                              1033, "lock: bad file/flush ''", "");
  expect_failure_with_details([&](const Detail& d) { file.lock(0, 0, d); },
                              1033, "lock: bad file/flush ''", "");
  expect_failure_with_details([&](const Detail& d) { file.unlock(0, 1, d); },
                              1092, "unlock: '' file error", "");
  EXPECT_FALSE(file.try_read(room, 4, &got));
  EXPECT_EQ(got, 0);
  EXPECT_FALSE(file.try_read(room, 0));
  EXPECT_FALSE(file.set_buffer(1000));
  EXPECT_EQ(file.getc(), -1);
  EXPECT_EQ(file.putc('x'), -1);
  EXPECT_TRUE(file.eof());
  EXPECT_FALSE(file.newline());
  expect_failure_with_details([&](const Detail& d) { file.sync(d); }, 1020,
                              "flush: '' operation failed", "");
  expect_failure_with_details([&](const Detail& d) { file.seek_end(d); }, 1012,
                              "seek: operation failed", "");
  expect_failure_with_details([&](const Detail& d) { file.tell(d); }, 1013,
                              "getpos: operation failed", "");
  EXPECT_ASSERTION(file.seek(0), "zxbfile");
  EXPECT_ASSERTION(file.try_seek(0), "zxbfile");
  EXPECT_EQ(file.lines, 0);
}

TEST_F(zxbfile, closing_a_closed_object_is_a_success) {
  zxBFile file;
  EXPECT_TRUE(file.close());
  file.close(k_detail);
  EXPECT_FALSE(file.is_open());
}

TEST_F(zxbfile, a_closed_object_behind_dropped_failures_gives_neutral_values) {
  zxBFile file;
  char room[4] = {'a', 'b', 'c', 'd'};
  std::int32_t got = 99;
  zxStr text = "old";
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(file.read(room, 4, &got));
    EXPECT_EQ(got, 0);
    EXPECT_FALSE(file.read(room, 0));
    EXPECT_FALSE(file.read_all(room, 4));
    EXPECT_FALSE(file.read_all(room, std::size_t{4}));
    EXPECT_FALSE(file.read_str(text, 4));
    EXPECT_TRUE(text.is_empty());
    text = "old";
    EXPECT_FALSE(file.read_str_all(text, 4));
    EXPECT_TRUE(text.is_empty());
    EXPECT_FALSE(file.gets(text));
    EXPECT_FALSE(file.try_write("xyz", 3));
    EXPECT_TRUE(file.get_name().is_empty());
    file.fastio();
    EXPECT_EQ(file.length(), -1);
    EXPECT_EQ(file.length(no_detail), -1);
    file.chsize(5);
    file.flush();
    EXPECT_FALSE(file.lock(0, 1));
    EXPECT_FALSE(file.lock(0, 0));
    file.unlock(0, 1);
    EXPECT_FALSE(file.try_seek(0));
    file.write("xyz", 3);
    file.write("xyz", std::size_t{3});
    file.puts("xyz");
    file.sync();
    EXPECT_FALSE(file.seek(0));
    EXPECT_FALSE(file.seek(5));
    EXPECT_FALSE(file.seek_end());
    EXPECT_EQ(file.tell(), -1);
  });
  EXPECT_EQ(std::string(room, 4), "abcd");
  EXPECT_FALSE(file.is_open());
  EXPECT_EQ(file.lines, 0);
}

// ---- opening

TEST_F(zxbfile, an_opened_object_has_its_name_and_no_lines) {
  const std::string fresh = folder.file("fresh");
  for (const Opening& opening : k_openings) {
    SCOPED_TRACE(opening.label);
    const bool is_new = opening.label == std::string("create_new") ||
                        opening.label == std::string("try_create_new") ||
                        opening.label == std::string("try_create_private");
    const zxStr used = is_new ? zxStr(fresh.c_str()) : name;
    zxBFile file;
    file.lines = 12;
    opening.open(file, used);
    EXPECT_TRUE(file.is_open());
    EXPECT_TRUE(file.name == used);
    EXPECT_EQ(file.lines, 0);
    EXPECT_EQ(file.tell(), 0);
    EXPECT_TRUE(file.close());
    EXPECT_FALSE(file.is_open());
    EXPECT_TRUE(file.name.is_empty());
    fs::remove(fresh);
  }
}

TEST_F(zxbfile, the_try_forms_tell_their_success) {
  zxBFile file;
  EXPECT_TRUE(file.open(name));
  file.close();
  EXPECT_TRUE(file.open_rw(name));
  file.close();
  EXPECT_TRUE(file.try_create(name));
  file.close();
  EXPECT_TRUE(file.try_create_private(missing_name));
  file.close();
  EXPECT_TRUE(file.try_create_new(folder.file("another").c_str()));
  file.close();
  EXPECT_TRUE(file.try_append(name));
}

TEST_F(zxbfile, a_constructor_opens_for_reading) {
  zxBFile file(name);
  EXPECT_TRUE(file.is_open());
  EXPECT_TRUE(file.name == name);
  EXPECT_EQ(read(file, 20), k_bytes);
  expect_failure([&] { zxBFile none(missing_name); }, 1002,
                 "open: Can't open file " + quoted(missing) + " for reading",
                 missing);
  kit::with_failures_dropped([&] {
    zxBFile none(missing_name);
    EXPECT_FALSE(none.is_open());
  });
}

TEST_F(zxbfile, appending_keeps_an_old_file_and_makes_a_new_one) {
  zxBFile file;
  ASSERT_TRUE(file.try_append(name));
  EXPECT_EQ(file.tell(), 10);
  write(file, "abc");
  EXPECT_EQ(file.tell(), 13);
  file.close(no_detail);
  EXPECT_EQ(bytes(), "0123456789abc");
  file.append(missing_name);
  EXPECT_EQ(file.tell(), 0);
  file.puts("new");
  file.close(no_detail);
  EXPECT_EQ(read_file(missing), "new");
}

TEST_F(zxbfile, appending_writes_at_the_end_wherever_the_position_is) {
  zxBFile file;
  file.append(name);
  file.seek(2);
  write(file, "a");
  file.flush();
  write_file(path, "shorter");
  file.seek(0);
  file.putc('b');
  EXPECT_TRUE(file.close());
  EXPECT_EQ(bytes(), "shorterb");
}

TEST_F(zxbfile, objects_share_an_open_file) {
  zxBFile a;
  zxBFile b;
  zxBFile c;
  zxBFile d;
  EXPECT_TRUE(a.try_append(name));
  EXPECT_TRUE(b.open(name));
  EXPECT_TRUE(c.open_rw(name));
  EXPECT_TRUE(d.try_create(name));
  write(d, "abc");
  d.flush();
  EXPECT_EQ(read(b, 5), "abc");
}

TEST_F(zxbfile, the_name_is_told_while_the_file_is_open) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  EXPECT_TRUE(file.get_name() == name);
  EXPECT_EQ(file.get_name().representation(), name.representation());
  file.close();
  expect_failure([&] { file.get_name(); }, 1007, "get_name: File not open", "");
}

TEST_F(zxbfile, reading_reads_and_reading_and_writing_does_both) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  EXPECT_EQ(read(file, 20), k_bytes);
  file.close();
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_EQ(read(file, 2), "01");
  write(file, "ab");
  EXPECT_EQ(read(file, 2), "45");
  EXPECT_TRUE(file.close());
  EXPECT_EQ(bytes(), "01ab456789");
}

TEST_F(zxbfile, creating_cuts_an_old_file_and_makes_a_new_one) {
  zxBFile file;
  ASSERT_TRUE(file.try_create(name));
  EXPECT_EQ(bytes(), "");
  file.close();
  file.create(missing_name);
  write(file, "new");
  EXPECT_TRUE(file.close());
  EXPECT_EQ(read_file(missing), "new");
}

TEST_F(zxbfile, a_missing_file_is_refused_and_not_made) {
  zxBFile file;
  EXPECT_FALSE(file.open(missing_name));
  EXPECT_FALSE(file.open_rw(missing_name));
  EXPECT_FALSE(file.is_open());
  EXPECT_TRUE(file.name.is_empty());
  EXPECT_FALSE(fs::exists(missing));
  expect_failure_with_details(
      [&](const BailDetail& d) { file.open_rw_or_die(missing_name, d); }, 1006,
      "open_rw: Can't open file " + quoted(missing) + " for read/write",
      missing);
  expect_failure_with_details(
      [&](const BailDetail& d) { file.open_or_die(missing_name, d); }, 1002,
      "open: Can't open file " + quoted(missing) + " for reading", missing);
  EXPECT_FALSE(file.is_open());
}

TEST_F(zxbfile, a_file_in_a_missing_folder_is_not_made) {
  const std::string lost = folder.file("none") + "\\file";
  const zxStr lost_name = lost.c_str();
  zxBFile file;
  EXPECT_FALSE(file.try_create(lost_name));
  EXPECT_FALSE(file.try_create_private(lost_name));
  EXPECT_FALSE(file.try_append(lost_name));
  EXPECT_FALSE(file.try_create_new(lost_name));
  const std::string message =
      "create: Can't open file " + quoted(lost) + " for writing";
  expect_failure_with_details(
      [&](const BailDetail& d) { file.create(lost_name, d); }, 1004, message,
      lost);
  expect_failure_with_details(
      [&](const BailDetail& d) { file.append(lost_name, d); }, 1004, message,
      lost);
  expect_failure_with_details(
      [&](const BailDetail& d) { file.create_new(lost_name, d); }, 1004,
      message, lost);
  EXPECT_FALSE(file.is_open());
}

TEST_F(zxbfile, a_folder_is_no_file) {
  const zxStr folder_name = folder.path().c_str();
  zxBFile file;
  EXPECT_FALSE(file.open(folder_name));
  EXPECT_FALSE(file.open_rw(folder_name));
  EXPECT_FALSE(file.try_create(folder_name));
  EXPECT_FALSE(file.try_append(folder_name));
  EXPECT_FALSE(file.try_create_private(folder_name));
  EXPECT_FALSE(file.try_create_new(folder_name));
  EXPECT_FALSE(file.is_open());
}

TEST_F(zxbfile, a_file_that_may_not_be_written_opens_for_reading_alone) {
  fs::permissions(
      path,
      fs::perms::owner_write | fs::perms::group_write | fs::perms::others_write,
      fs::perm_options::remove);
  zxBFile file;
  EXPECT_FALSE(file.open_rw(name));
  EXPECT_FALSE(file.try_create(name));
  EXPECT_FALSE(file.try_append(name));
  EXPECT_TRUE(file.open(name));
  EXPECT_EQ(read(file, 20), k_bytes);
}

TEST_F(zxbfile, a_new_file_must_have_a_free_name) {
  zxBFile file;
  EXPECT_FALSE(file.try_create_private(name));
  EXPECT_FALSE(file.try_create_new(name));
  expect_failure_with_details(
      [&](const BailDetail& d) { file.create_new(name, d); }, 1004,
      "create: Can't open file " + quoted(path) + " for writing", path);
  EXPECT_EQ(bytes(), k_bytes);
  file.create_new(missing_name);
  write(file, "new");
  EXPECT_TRUE(file.close());
  EXPECT_EQ(read_file(missing), "new");
}

TEST_F(zxbfile, a_new_file_never_goes_through_a_link) {
  const std::string link = folder.file("link");
  const std::string dangling = folder.file("dangling");
  if (!kit::make_link(path, link) || !kit::make_link(missing, dangling))
    GTEST_SKIP() << "a program cannot make links here";
  zxBFile file;
  for (const std::string& at : {link, dangling}) {
    EXPECT_FALSE(file.try_create_private(at.c_str()));
    EXPECT_FALSE(file.try_create_new(at.c_str()));
    expect_failure([&] { file.create_new(at.c_str()); }, 1004,
                   "create: Can't open file " + quoted(at) + " for writing",
                   at);
  }
  EXPECT_EQ(bytes(), k_bytes);
  EXPECT_FALSE(fs::exists(missing));
}

TEST_F(zxbfile, a_private_file_is_its_owners_alone) {
  if (kit::on_windows()) GTEST_SKIP() << "permissions are not shown here";
  zxBFile file;
  ASSERT_TRUE(file.try_create_private(missing_name));
  EXPECT_EQ(fs::status(missing).permissions(),
            fs::perms::owner_read | fs::perms::owner_write);
}

TEST_F(zxbfile, an_open_object_is_not_opened_again_in_any_way) {
  for (const Opening& opening : k_openings) {
    SCOPED_TRACE(opening.label);
    zxBFile file;
    ASSERT_TRUE(file.open(name));
    EXPECT_EQ(read(file, 3), "012");
    const zxStream* stream = file.handle;
    expect_failure([&] { opening.open(file, missing_name); },
                   opening.already_open,
                   filled(opening.already_open_text, missing), missing);
    kit::with_failures_dropped([&] { opening.open(file, missing_name); });
    EXPECT_EQ(file.handle, stream);
    EXPECT_TRUE(file.name == name);
    EXPECT_EQ(read(file, 20), "3456789");
    EXPECT_FALSE(fs::exists(missing));
  }
}

TEST_F(zxbfile, an_open_object_refuses_even_names_that_no_file_can_have) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  expect_failure([&] { file.open(""); }, 1009, "open: File '' already open",
                 "");
  expect_failure([&] { file.open_rw("-"); }, 1005,
                 "open_rw: File already open '-'", "-");
}

TEST_F(zxbfile, a_dropped_failure_to_open_leaves_a_closed_object) {
  zxBFile file;
  kit::with_failures_dropped([&] {
    file.open_or_die(missing_name);
    EXPECT_FALSE(file.is_open());
    file.create(folder.path().c_str());
    EXPECT_FALSE(file.is_open());
    file.append(folder.path().c_str());
    EXPECT_FALSE(file.is_open());
    file.open_rw_or_die(missing_name);
    EXPECT_FALSE(file.is_open());
    file.create_new(name);
    EXPECT_FALSE(file.is_open());
  });
  EXPECT_EQ(bytes(), k_bytes);
  EXPECT_TRUE(file.open(name));
}

// ---- names

// A name in the folder that is `length` bytes long.
std::string name_of_length(const TempDir& folder, std::size_t length) {
  std::string long_name = folder.file("");
  EXPECT_LT(long_name.size(), length);
  long_name.resize(length, 'n');
  return long_name;
}

TEST_F(zxbfile, a_name_of_254_bytes_is_the_longest) {
  const std::string longest = name_of_length(folder, 254);
  zxBFile file;
  file.create(longest.c_str());
  write(file, "long");
  EXPECT_TRUE(text_of(file.name) == longest);
  file.close(no_detail);
  EXPECT_EQ(read_file(longest), "long");
  EXPECT_TRUE(file.open(longest.c_str()));
}

TEST_F(zxbfile, a_name_of_255_bytes_is_refused_without_a_call) {
  const std::string too_long = name_of_length(folder, 255);
  const zxStr too_long_name = too_long.c_str();
  const Faults calls;
  zxplat::set_last_error(1234);
  zxBFile file;
  EXPECT_FALSE(file.open(too_long_name));
  EXPECT_FALSE(file.open_rw(too_long_name));
  EXPECT_FALSE(file.try_create(too_long_name));
  EXPECT_FALSE(file.try_append(too_long_name));
  EXPECT_FALSE(file.try_create_private(too_long_name));
  EXPECT_FALSE(file.try_create_new(too_long_name));
  EXPECT_EQ(zxplat::last_error(), 1234);
  expect_failure([&] { file.open_or_die(too_long_name); }, 1002,
                 "open: Can't open file " + quoted(too_long) + " for reading",
                 too_long);
  expect_failure([&] { file.create(too_long_name); }, 1004,
                 "create: Can't open file " + quoted(too_long) + " for writing",
                 too_long);
  EXPECT_EQ(calls.count(Call::open), 0);
  EXPECT_FALSE(file.is_open());
}

TEST_F(zxbfile, an_empty_name_is_refused_without_a_call) {
  const Faults calls;
  zxBFile file;
  EXPECT_FALSE(file.open(""));
  EXPECT_FALSE(file.open_rw(""));
  EXPECT_FALSE(file.try_create(""));
  EXPECT_FALSE(file.try_create_private(""));
  EXPECT_FALSE(file.try_create_new(""));
  expect_failure([&] { file.open_or_die(""); }, 1002,
                 "open: Can't open file '' for reading", "");
  EXPECT_FALSE(file.try_append(""));
  expect_failure([&] { file.append(""); }, 1004,
                 "create: Can't open file '' for writing", "");
  expect_failure([&] { file.open_rw_or_die(""); }, 1006,
                 "open_rw: Can't open file '' for read/write", "");
  expect_failure([&] { file.create(""); }, 1004,
                 "create: Can't open file '' for writing", "");
  expect_failure([&] { file.create_new(""); }, 1004,
                 "create: Can't open file '' for writing", "");
  EXPECT_EQ(calls.count(Call::open), 0);
}

TEST_F(zxbfile, a_name_with_a_nul_is_not_the_name_up_to_the_nul) {
  zxStr with_nul = name;
  with_nul.append('\0').append("x");
  zxStr new_with_nul = missing_name;
  new_with_nul.append('\0');
  zxBFile file;
  EXPECT_FALSE(file.open(with_nul));
  EXPECT_FALSE(file.open_rw(with_nul));
  EXPECT_FALSE(file.try_create(with_nul));
  EXPECT_FALSE(file.try_append(with_nul));
  EXPECT_FALSE(file.try_create(new_with_nul));
  EXPECT_FALSE(file.try_create_private(new_with_nul));
  EXPECT_FALSE(file.try_create_new(new_with_nul));
  EXPECT_EQ(bytes(), k_bytes);
  EXPECT_FALSE(fs::exists(missing));
}

TEST_F(zxbfile, a_dash_is_the_standard_input_or_output) {
  zxStream* const in = &zx_standard_stream(zxplat::k_stdin_fd);
  zxStream* const out = &zx_standard_stream(zxplat::k_stdout_fd);
  const Faults calls;
  zxBFile file;
  EXPECT_TRUE(file.open("-"));
  EXPECT_EQ(file.handle, in);
  EXPECT_TRUE(file.name == "-");
  EXPECT_TRUE(file.close());
  EXPECT_EQ(file.handle, nullptr);
  EXPECT_TRUE(file.name.is_empty());
  file.open_or_die("-");
  EXPECT_EQ(file.handle, in);
  file.close(no_detail);
  EXPECT_TRUE(file.try_create("-"));
  EXPECT_EQ(file.handle, out);
  EXPECT_TRUE(file.close());
  file.create("-");
  EXPECT_EQ(file.handle, out);
  file.close(no_detail);
  EXPECT_TRUE(file.try_append("-"));
  EXPECT_EQ(file.handle, out);
  EXPECT_TRUE(file.close());
  EXPECT_EQ(calls.count(Call::open), 0);
  EXPECT_EQ(calls.count(Call::close), 0);
}

TEST_F(zxbfile, a_dash_for_reading_and_writing_fails_an_assertion) {
  zxBFile file;
  expect_failure([&] { file.open_rw("-"); }, 1000, "bailed out: zxfile:185 ",
                 "zxfile:185");
  expect_failure([&] { file.open_rw_or_die("-"); }, 1000,
                 "bailed out: zxfile:185 ", "zxfile:185");
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(file.open_rw("-"));
    file.open_rw_or_die("-");
  });
  EXPECT_FALSE(file.is_open());
}

TEST_F(zxbfile, more_than_a_dash_is_a_file) {
  const zxStr dash = (folder.path() + "\\-").c_str();
  zxBFile file;
  file.create(dash);
  write(file, "x");
  file.close(no_detail);
  EXPECT_EQ(read_file(folder.file("-")), "x");
}

// A program whose standard output is closed by one object goes on to write
// by another.
ZX_CASE(zxbfile_writes_to_a_dash_twice) {
  init_zxlib_args(argc, argv);
  for (const char* text : {"one\r\n", "two\n"}) {
    zxBFile file;
    file.create("-");
    file.puts(text);
    file.close(no_detail);
  }
  zxBFile in;
  in.open_or_die("-");
  char room[100];
  std::int32_t got = 0;
  while (in.read(room, sizeof room, &got)) g_stdout.write(room, got);
  return 0;
}

TEST_F(zxbfile, a_dash_passes_bytes_in_and_out_as_they_are) {
  kit::ProcessOptions options;
  options.input = std::string("a\r\nb\nc\r\x1A\0d", 10);
  const kit::ProcessResult result =
      kit::run_case("zxbfile_writes_to_a_dash_twice", {}, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "one\r\ntwo\n" + options.input);
  EXPECT_EQ(result.err, "");
}

// ---- reading

TEST_F(zxbfile, a_read_has_three_outcomes) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  char room[20] = {};
  std::int32_t got = -1;
  EXPECT_TRUE(file.read(room, 4, &got));  // all
  EXPECT_EQ(got, 4);
  EXPECT_EQ(std::string(room, 4), "0123");
  EXPECT_TRUE(file.read(room, 20, &got));  // some
  EXPECT_EQ(got, 6);
  EXPECT_EQ(std::string(room, 6), "456789");
  EXPECT_FALSE(file.read(room, 20, &got));  // the end
  EXPECT_EQ(got, 0);
}

TEST_F(zxbfile, without_a_count_some_is_not_enough) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  char room[20] = {};
  EXPECT_TRUE(file.read(room, 4));
  EXPECT_FALSE(file.read(room, 7));
  EXPECT_EQ(file.tell(), 10);
  EXPECT_FALSE(file.read(room, 1));
}

TEST_F(zxbfile, reading_nothing_succeeds_anywhere) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  std::int32_t got = -1;
  EXPECT_TRUE(file.read(nullptr, 0, &got));
  EXPECT_EQ(got, 0);
  file.seek_end();
  EXPECT_TRUE(file.read(nullptr, 0));
  EXPECT_TRUE(file.read_all(nullptr, 0));
}

TEST_F(zxbfile, a_failed_read_is_fatal) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  char room[4];
  std::int32_t got = -1;
  Faults faults;
  faults.fail_all(Call::read);
  const std::string message = "read: " + quoted(path) + " operation failed";
  expect_failure_with_details(
      [&](const BailDetail& d) { file.read(room, 4, nullptr, d); }, 1014,
      message, path);
  expect_failure_with_details(
      [&](const BailDetail& d) { file.read(room, 4, &got, d); }, 1014, message,
      path);
  EXPECT_EQ(got, 0);
  kit::with_failures_dropped([&] { EXPECT_FALSE(file.read(room, 4, &got)); });
  EXPECT_TRUE(file.is_open());
}

TEST_F(zxbfile, with_a_count_a_read_that_fails_later_gives_what_came) {
  write_file(path, std::string(10'000, 'x'));
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  std::string room(10'000, '?');
  std::int32_t got = -1;
  Faults faults;
  faults.fail_nth(Call::read, 2);
  EXPECT_TRUE(file.read(room.data(), 10'000, &got));
  EXPECT_GT(got, 0);
  EXPECT_LT(got, 10'000);
  // The error stays: at the end of the file it is told.
  EXPECT_TRUE(file.read(room.data(), 10'000, &got));
  EXPECT_EQ(file.tell(), 10'000);
  expect_failure([&] { file.read(room.data(), 1, &got); }, 1014,
                 "read: " + quoted(path) + " operation failed", path);
}

TEST_F(zxbfile, reading_an_output_file_is_fatal) {
  zxBFile file;
  file.create(missing_name);
  char room[4];
  expect_failure([&] { file.read(room, 4); }, 1014,
                 "read: " + quoted(missing) + " operation failed", missing);
}

TEST_F(zxbfile, read_all_takes_nothing_less) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  char room[20];
  EXPECT_TRUE(file.read_all(room, 10));
  EXPECT_EQ(std::string(room, 10), k_bytes);
  const std::string message = "read: " + quoted(path) + " operation failed";
  for (const std::int32_t place : {10, 9, 1}) {
    file.seek(place);
    expect_failure_with_details(
        [&](const BailDetail& d) { file.read_all(room, 10, d); }, 1014, message,
        path);
  }
}

TEST_F(zxbfile, a_try_to_read_tells_all_by_its_result) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  char room[20] = {};
  std::int32_t got = -1;
  EXPECT_TRUE(file.try_read(room, 4, &got));  // all
  EXPECT_EQ(got, 4);
  EXPECT_TRUE(file.try_read(room, 2));
  EXPECT_EQ(std::string(room, 2), "45");
  EXPECT_TRUE(file.try_read(room, 20, &got));  // some
  EXPECT_EQ(got, 4);
  EXPECT_EQ(std::string(room, 4), "6789");
  EXPECT_FALSE(file.try_read(room, 20, &got));  // the end
  EXPECT_EQ(got, 0);
  EXPECT_TRUE(file.try_read(room, 0, &got));
  file.seek(8);
  EXPECT_FALSE(file.try_read(room, 3));  // without a count some is too little
  file.seek(9000);
  Faults faults;
  faults.fail_nth(Call::read, 1);
  EXPECT_FALSE(file.try_read(room, 4, &got));
  EXPECT_EQ(got, 0);
}

TEST_F(zxbfile, a_text_takes_what_came) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text = "what was there before";
  EXPECT_TRUE(file.read_str(text, 4));
  EXPECT_TRUE(text == "0123");
  EXPECT_TRUE(file.read_str(text, 0));
  EXPECT_TRUE(text.is_empty());
  EXPECT_TRUE(file.read_str(text, 200));
  EXPECT_TRUE(text == "456789");
  EXPECT_FALSE(file.read_str(text, 200));
  EXPECT_TRUE(text.is_empty());
  EXPECT_TRUE(file.read_str(text, 0));
}

TEST_F(zxbfile, a_text_takes_every_byte_and_leaves_its_sharers_alone) {
  const std::string all("\0\r\n\x1A\xFF\0", 6);
  write_file(path, all);
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text = "shared";
  const zxStr sharer = text;
  EXPECT_TRUE(file.read_str(text, 6));
  EXPECT_EQ(text_of(text), all);
  EXPECT_TRUE(sharer == "shared");
  file.seek(0);
  zxIStr inner = "inside";
  EXPECT_TRUE(file.read_str_all(inner, 6));
  EXPECT_EQ(text_of(inner), all);
}

TEST_F(zxbfile, a_text_that_must_come_may_be_shorter_but_not_missing) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text;
  EXPECT_TRUE(file.read_str_all(text, 200));
  EXPECT_TRUE(text == "0123456789");
  EXPECT_TRUE(file.read_str_all(text, 0));
  expect_failure([&] { file.read_str_all(text, 1); }, 1000,
                 "bailed out: zxbfile:222 ", "zxbfile:222");
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(file.read_str_all(text, 1));
    EXPECT_TRUE(text.is_empty());
  });
  Faults faults;
  faults.fail_all(Call::read);
  const std::string message = "read: " + quoted(path) + " operation failed";
  expect_failure([&] { file.read_str(text, 5); }, 1014, message, path);
  expect_failure([&] { file.read_str_all(text, 5); }, 1014, message, path);
}

TEST_F(zxbfile, sizes_of_memory_are_taken_as_they_are) {
  zxBFile file;
  file.create(missing_name);
  file.write("abcdef", sizeof "abcdef" - 1);
  file.write("", std::size_t{0});
  file.close(no_detail);
  EXPECT_EQ(read_file(missing), "abcdef");
  ASSERT_TRUE(file.open(missing_name));
  char room[6];
  EXPECT_TRUE(file.read_all(room, sizeof room));
  EXPECT_EQ(std::string(room, 6), "abcdef");
  EXPECT_TRUE(file.read_all(room, std::size_t{0}));
  expect_failure_with_details(
      [&](const BailDetail& d) { file.read_all(room, sizeof room, d); }, 1014,
      "read: " + quoted(missing) + " operation failed", missing);
}

TEST_F(zxbfile, negative_sizes_fail_an_assertion) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  char room[4] = {'a', 'b', 'c', 'd'};
  std::int32_t got = 99;
  for (const std::int32_t size : {-1, INT32_MIN}) {
    EXPECT_ASSERTION(file.read(room, size, &got), "zxbfile");
    EXPECT_ASSERTION(file.read_all(room, size), "zxbfile");
    EXPECT_ASSERTION(file.write(room, size), "zxbfile");
    EXPECT_ASSERTION(file.try_write(room, size), "zxbfile");
    EXPECT_ASSERTION(file.try_read(room, size, &got), "zxbfile");
    zxStr text = "text";
    EXPECT_ASSERTION(file.read_str(text, size), "zxbfile");
    EXPECT_TRUE(text == "text");
    EXPECT_ASSERTION(file.lock(0, size), "zxbfile");
    EXPECT_ASSERTION(file.unlock(0, size), "zxbfile");
    kit::with_failures_dropped([&] {
      EXPECT_FALSE(file.read(room, size, &got));
      EXPECT_EQ(got, 0);
      EXPECT_FALSE(file.read_all(room, size));
      file.write(room, size);
      EXPECT_FALSE(file.try_write(room, size));
      EXPECT_FALSE(file.try_read(room, size, &got));
      EXPECT_EQ(got, 0);
      EXPECT_FALSE(file.read_str(text, size));
      EXPECT_TRUE(text == "text");
      EXPECT_FALSE(file.lock(0, size));
      file.unlock(0, size);
    });
  }
  EXPECT_EQ(std::string(room, 4), "abcd");
  EXPECT_EQ(file.tell(), 0);
  EXPECT_TRUE(file.close());
  EXPECT_EQ(bytes(), k_bytes);
}

// ---- writing

TEST_F(zxbfile, a_write_that_the_system_refuses_is_fatal) {
  const std::string large(100'000, 'x');
  zxBFile file;
  file.create(missing_name);
  Faults faults;
  faults.fail_all(Call::write, zxplat::k_err_disk_full);
  expect_failure_with_details(
      [&](const BailDetail& d) { file.write(large.data(), 100'000, d); }, 1016,
      "write: failed on " + quoted(missing), missing);
  const zxStr large_text(std::string_view{large});
  expect_failure([&] { file.puts(large_text); }, 1016,
                 "write: failed on " + quoted(missing), missing);
  EXPECT_TRUE(file.is_open());
  EXPECT_FALSE(file.close());
}

TEST_F(zxbfile, writing_nothing_succeeds) {
  zxBFile file;
  file.create(missing_name);
  file.write(nullptr, 0);
  EXPECT_TRUE(file.close());
  EXPECT_EQ(read_file(missing), "");
}

TEST_F(zxbfile, puts_writes_bytes_as_they_are_and_counts_lines) {
  zxBFile file;
  file.create(missing_name);
  file.puts(zxStr("a\0b", 3));
  file.puts("");
  file.puts("c\nd\r\n");
  EXPECT_EQ(file.lines, 3);
  write(file, "e\n");
  EXPECT_EQ(file.lines, 3);
  file.close(no_detail);
  EXPECT_EQ(read_file(missing), std::string("a\0bc\nd\r\ne\n", 10));
}

TEST_F(zxbfile, a_try_to_write_tells_by_its_result) {
  const std::string large(100'000, 'x');
  zxBFile file;
  file.create(missing_name);
  EXPECT_TRUE(file.try_write("abc", 3));
  EXPECT_TRUE(file.try_write(nullptr, 0));
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_FALSE(file.try_write(large.data(), 100'000));
  EXPECT_TRUE(file.is_open());
  EXPECT_FALSE(file.close());
}

TEST_F(zxbfile, a_flush_brings_the_bytes_to_the_system_and_no_further) {
  zxBFile file;
  file.create(missing_name);
  write(file, "abc");
  const Faults calls;
  EXPECT_EQ(read_file(missing), "");
  file.flush();
  EXPECT_EQ(read_file(missing), "abc");
  EXPECT_EQ(calls.count(Call::flush), 0);
  EXPECT_EQ(calls.count(Call::write), 1);
  file.close();
  ASSERT_TRUE(file.open(name));
  EXPECT_EQ(read(file, 2), "01");
  file.flush();
  EXPECT_EQ(read(file, 2), "23");
}

TEST_F(zxbfile, a_failed_flush_is_fatal) {
  zxBFile file;
  file.create(missing_name);
  for (const BailDetail& detail : {no_detail, k_detail}) {
    write(file, "abc");
    Faults faults;
    faults.fail_nth(Call::write, 1);
    expect_failure([&] { file.flush(detail); }, 1020,
                   "flush: " + quoted(missing) + " operation failed", missing,
                   detail);
  }
  EXPECT_FALSE(file.close());
}

// Whatever call first meets the disk when it is full, it tells, and the close
// tells in any case.
TEST_F(zxbfile, bytes_that_wait_are_refused_later) {
  constexpr std::int32_t k_buffer = 65'536;
  const std::string large(2 * k_buffer, 'x');
  const struct {
    std::int32_t size;  // of one write
    bool is_refused_at_once;
  } rows[] = {
      {1, false},           {k_buffer - 1, false}, {k_buffer, true},
      {k_buffer + 1, true}, {2 * k_buffer, true},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.size);
    for (const bool is_flushed : {false, true}) {
      zxBFile file;
      file.create(missing_name);
      Faults faults;
      faults.fail_nth(Call::write, 1, zxplat::k_err_disk_full);
      EXPECT_EQ(file.try_write(large.data(), row.size),
                !row.is_refused_at_once);
      if (is_flushed && !row.is_refused_at_once) {
        expect_failure([&] { file.flush(); }, 1020,
                       "flush: " + quoted(missing) + " operation failed",
                       missing);
      }
      EXPECT_FALSE(file.close());
    }
  }
}

TEST_F(zxbfile, each_of_many_writes_may_be_the_one_that_fails) {
  for (int n = 1; n <= 6; ++n) {
    SCOPED_TRACE(n);
    zxBFile file;
    file.create(missing_name);
    Faults faults;
    faults.fail_nth(Call::write, n);
    int refused = 0;
    for (int i = 0; i < 330'000; ++i)
      if (file.putc('x') < 0) ++refused;
    // Five times the buffer fills; the rest waits for the close.
    EXPECT_EQ(refused, n <= 5 ? 1 : 0);
    EXPECT_FALSE(file.close());
    EXPECT_EQ(faults.count(Call::write), 6);
  }
}

// A small file system of memory, for as long as one lives.
class SmallDisk {
 public:
  SmallDisk() {
    is_there =
        run({"mount", "-t", "tmpfs", "-o", "size=64k", "tmpfs", folder.path()});
  }
  SmallDisk(const SmallDisk&) = delete;
  SmallDisk& operator=(const SmallDisk&) = delete;
  ~SmallDisk() {
    if (is_there) run({"umount", "-l", folder.path()});
  }

  bool is_there = false;
  TempDir folder;

 private:
  static bool run(const std::vector<std::string>& command) {
    try {
      return kit::run_process(command).exit_code == 0;
    } catch (const std::runtime_error&) {
      return false;  // there is no such program
    }
  }
};

TEST_F(zxbfile, a_disk_that_runs_full_is_told_by_the_first_call_that_meets_it) {
  if (kit::on_windows()) GTEST_SKIP() << "no small disk can be made here";
  const SmallDisk disk;
  if (!disk.is_there) GTEST_SKIP() << "no small disk can be mounted here";
  const std::string full = disk.folder.file("file");
  const std::string bytes(65'000, 'x');
  zxBFile file;
  file.create(full.c_str());
  EXPECT_TRUE(file.try_write(bytes.data(), 65'000));
  file.flush();
  EXPECT_TRUE(file.try_write(bytes.data(), 1000));  // it waits
  expect_failure([&] { file.flush(); }, 1020,
                 "flush: " + quoted(full) + " operation failed", full);
  EXPECT_FALSE(file.try_write(bytes.data(), 65'000) &&
               file.try_write(bytes.data(), 65'000));
  EXPECT_FALSE(file.close());
  EXPECT_EQ(read_file(full).size(), 65'536U);
}

TEST_F(zxbfile, a_sync_brings_the_bytes_down) {
  zxBFile file;
  file.create(missing_name);
  write(file, "abc");
  const Faults calls;
  file.sync();
  EXPECT_EQ(calls.count(Call::flush), 1);
  EXPECT_EQ(read_file(missing), "abc");
}

TEST_F(zxbfile, a_failed_sync_is_fatal) {
  const std::string message = "flush: " + quoted(missing) + " operation failed";
  for (const Call call : {Call::write, Call::flush}) {
    SCOPED_TRACE(kit::name_of(call));
    zxBFile file;
    file.create(missing_name);
    for (const BailDetail& detail : {no_detail, k_detail}) {
      Faults faults;
      faults.fail_nth(call, 1);
      write(file, "abc");
      expect_failure([&] { file.sync(detail); }, 1020, message, missing,
                     detail);
    }
    EXPECT_FALSE(file.close());
  }
}

// ---- buffers

TEST_F(zxbfile, bulk_reading_starts_with_large_reads) {
  write_file(path, std::string(100'000, 'x'));
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  file.fastio();
  const Faults calls;
  EXPECT_EQ(read(file, 24'576).size(), 24'576U);
  EXPECT_EQ(calls.count(Call::read), 1);
  file.seek(0);
  EXPECT_TRUE(file.set_buffer(16'384));
  file.seek(50'000);
  EXPECT_EQ(read(file, 16'384).size(), 16'384U);
  EXPECT_EQ(calls.count(Call::read), 2);
}

TEST_F(zxbfile, bulk_reading_loses_nothing) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_EQ(read(file, 2), "01");
  file.fastio();
  EXPECT_EQ(read(file, 2), "23");
  write(file, "ab");
  file.fastio();
  EXPECT_EQ(bytes(), "0123ab6789");
  EXPECT_EQ(read(file, 9), "6789");
}

TEST_F(zxbfile, a_buffer_that_cannot_be_set_is_told) {
  zxBFile file;
  file.create(missing_name);
  for (const std::int32_t size : {0, -1, INT32_MIN})
    EXPECT_FALSE(file.set_buffer(size)) << size;
  Faults faults;
  faults.fail_nth(Call::write, 1);
  write(file, "abc");
  expect_failure([&] { file.fastio(); }, 1011,
                 "fastio: " + quoted(missing) + " failed", missing);
  EXPECT_FALSE(file.close());
}

// ---- bytes

TEST_F(zxbfile, bytes_are_numbers_from_0_to_255) {
  zxBFile file;
  file.create(missing_name);
  for (int byte = 0; byte < 256; ++byte) EXPECT_EQ(file.putc(byte), byte);
  EXPECT_EQ(file.putc(-1), 255);
  EXPECT_EQ(file.putc('\xE0'), 0xE0);
  EXPECT_EQ(file.putc(0x141), 0x41);
  file.close(no_detail);
  ASSERT_TRUE(file.open(missing_name));
  for (int byte = 0; byte < 256; ++byte) EXPECT_EQ(file.getc(), byte);
  EXPECT_EQ(file.getc(), 255);
  EXPECT_EQ(file.getc(), 0xE0);
  EXPECT_EQ(file.getc(), 0x41);
  EXPECT_EQ(file.lines, 0);
}

TEST_F(zxbfile, the_end_is_met_by_a_read_and_left_by_a_seek) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  file.seek(9);
  EXPECT_FALSE(file.eof());
  EXPECT_EQ(file.getc(), '9');
  EXPECT_FALSE(file.eof());
  EXPECT_EQ(file.getc(), -1);
  EXPECT_TRUE(file.eof());
  EXPECT_EQ(file.getc(), -1);
  file.seek(10);
  EXPECT_FALSE(file.eof());
}

TEST_F(zxbfile, bytes_that_do_not_pass_are_minus_one) {
  zxBFile file;
  file.create(missing_name);
  EXPECT_EQ(file.getc(), -1);
  EXPECT_FALSE(file.eof());  // it is an error
  file.close();
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_EQ(file.getc(), '0');
  Faults faults;
  faults.fail_nth(Call::seek, 1);
  EXPECT_EQ(file.putc('x'), -1);
  EXPECT_FALSE(file.close());
  EXPECT_EQ(bytes(), k_bytes);
}

// ---- lines

// What gets() gives of a file with these bytes, call by call.
std::vector<std::string> lines_of(zxBFile& file) {
  std::vector<std::string> lines;
  zxStr text = "before";
  while (file.gets(text)) {
    lines.push_back(text_of(text));
    EXPECT_EQ(file.lines, static_cast<std::int32_t>(lines.size()));
  }
  EXPECT_TRUE(text.is_empty());
  EXPECT_EQ(file.lines, static_cast<std::int32_t>(lines.size()));
  return lines;
}

using Lines = std::vector<std::string>;

TEST_F(zxbfile, a_line_ends_behind_its_line_feed_or_with_the_file) {
  const struct {
    std::string bytes;
    Lines lines;
  } rows[] = {
      {"", {}},
      {"\n", {"\n"}},
      {"a", {"a"}},
      {"a\n", {"a\n"}},
      {"a\nb", {"a\n", "b"}},
      {"a\r\nb\r\n", {"a\r\n", "b\r\n"}},
      {"\n\n\n", {"\n", "\n", "\n"}},
      {"\r\r\n\r", {"\r\r\n", "\r"}},
      {std::string("a\0b\n\0\n\0", 7),
       {std::string("a\0b\n", 4), std::string("\0\n", 2),
        std::string("\0", 1)}},
      {"\x1A\n\xFF\n", {"\x1A\n", "\xFF\n"}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::PrintToString(row.bytes));
    write_file(path, row.bytes);
    zxBFile file;
    ASSERT_TRUE(file.open(name));
    EXPECT_EQ(lines_of(file), row.lines);
  }
}

TEST_F(zxbfile, a_line_has_any_length) {
  for (const std::size_t length :
       {99U, 100U, 101U, 199U, 200U, 201U, 4094U, 4095U, 4096U, 4097U, 12'287U,
        12'288U, 65'535U, 65'536U, 1'000'000U}) {
    SCOPED_TRACE(length);
    std::string line(length, 'x');
    for (std::size_t i = 0; i < length; i += 7)
      line[i] = static_cast<char>('a' + i % 26);
    write_file(path, "first\n" + line + "\n" + line);
    zxBFile file;
    ASSERT_TRUE(file.open(name));
    const Lines lines = lines_of(file);
    ASSERT_EQ(lines.size(), 3U);
    EXPECT_EQ(lines[0], "first\n");
    EXPECT_TRUE(lines[1] == line + "\n");
    EXPECT_TRUE(lines[2] == line);
  }
}

TEST_F(zxbfile, a_last_line_without_a_line_feed_is_followed_by_the_end) {
  write_file(path, "one\ntwo");
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text;
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(text == "two");
  EXPECT_TRUE(file.eof());
  EXPECT_EQ(file.lines, 2);
  for (int i = 0; i < 2; ++i) {
    EXPECT_FALSE(file.gets(text));
    EXPECT_TRUE(text.is_empty());
    EXPECT_EQ(file.lines, 2);
  }
}

TEST_F(zxbfile, a_text_of_its_own_is_used_again_for_lines_that_fit) {
  write_file(path, std::string(90, 'a') + "\n" + std::string(98, 'b') + "\nc");
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text;
  EXPECT_TRUE(file.gets(text));
  EXPECT_GE(text.capacity(), 100);
  const zxStrRep* const block = text.representation();
  while (file.gets(text)) EXPECT_EQ(text.representation(), block);
  EXPECT_EQ(file.lines, 3);
}

TEST_F(zxbfile, lines_leave_the_sharers_of_a_text_alone) {
  write_file(path, "one\ntwo\nthree");
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text = "kept";
  std::vector<zxStr> kept;
  do {
    kept.push_back(text);
  } while (file.gets(text));
  ASSERT_EQ(kept.size(), 4U);
  EXPECT_TRUE(kept[0] == "kept");
  EXPECT_TRUE(kept[1] == "one\n");
  EXPECT_TRUE(kept[2] == "two\n");
  EXPECT_TRUE(kept[3] == "three");
}

TEST_F(zxbfile, lines_fit_into_a_string_with_room_inside) {
  const std::string large(300, 'x');
  write_file(path, "one\n" + large + "\ntwo");
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxIStr text = "text";
  const zxStrRep* const inside = text.representation();
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(text == "one\n");
  EXPECT_EQ(text.representation(), inside);
  EXPECT_TRUE(file.gets(text));
  EXPECT_EQ(text_of(text), large + "\n");
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(text == "two");
}

TEST_F(zxbfile, lines_mix_with_other_reading_and_with_writing) {
  write_file(path, "one\ntwo\nthree\n");
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  zxStr text;
  EXPECT_EQ(file.getc(), 'o');
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(text == "ne\n");
  EXPECT_EQ(file.tell(), 4);
  file.puts("TW");
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(text == "o\n");
  EXPECT_EQ(file.lines, 3);
  file.seek(1);
  EXPECT_EQ(file.lines, 3);
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(text == "ne\n");
  EXPECT_EQ(file.lines, 4);
  file.seek(0);
  EXPECT_EQ(file.lines, 0);
}

TEST_F(zxbfile, an_error_ahead_of_a_line_is_fatal_and_behind_its_start_not) {
  write_file(path, std::string(100'000, 'x'));
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text = "old";
  const std::string message = "gets: file error (" + path + ")";
  Faults faults;
  faults.fail_nth(Call::read, 1);
  expect_failure([&] { file.gets(text); }, 1029, message, path);
  EXPECT_EQ(file.lines, 0);
  EXPECT_TRUE(text.is_empty());
  faults.fail_nth(Call::read, 2);
  EXPECT_TRUE(file.gets(text));
  const std::int32_t first = text.length();
  EXPECT_GT(first, 0);
  EXPECT_LT(first, 100'000);
  EXPECT_EQ(file.lines, 1);
  EXPECT_TRUE(file.gets(text));
  EXPECT_EQ(text.length(), 100'000 - first);
  // The error stays: the end tells it.
  expect_failure([&] { file.gets(text); }, 1029, message, path);
  kit::with_failures_dropped([&] { EXPECT_FALSE(file.gets(text)); });
  EXPECT_EQ(file.lines, 2);
}

TEST_F(zxbfile, lines_of_an_output_file_are_an_error) {
  zxBFile file;
  file.create(missing_name);
  zxStr text;
  expect_failure([&] { file.gets(text); }, 1029,
                 "gets: file error (" + missing + ")", missing);
}

TEST_F(zxbfile, a_new_line_is_cr_lf_and_counts_nothing) {
  zxBFile file;
  file.create(missing_name);
  EXPECT_TRUE(file.newline());
  file.puts("a");
  EXPECT_TRUE(file.newline());
  EXPECT_EQ(file.lines, 1);
  file.close(no_detail);
  EXPECT_EQ(read_file(missing), "\r\na\r\n");
  file.create(missing_name);
  file.handle->set_unbuffered();
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_FALSE(file.newline());
  EXPECT_FALSE(file.close());
}

TEST_F(zxbfile, the_count_of_lines_goes_round_at_its_end) {
  write_file(path, "a\nb\n");
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  file.lines = INT32_MAX;
  zxStr text;
  EXPECT_TRUE(file.gets(text));
  EXPECT_EQ(file.lines, INT32_MIN);
  file.lines = INT32_MAX;
  file.puts("c");
  EXPECT_EQ(file.lines, INT32_MIN);
}

// A file of "x", `left` of them, and then a line feed.
class LongLine {
 public:
  explicit LongLine(std::int64_t length) {
    left = length;
    zxplat::files.read = [](zxplat::Fd, void* buffer, std::size_t size) {
      if (left < 0) return std::int64_t{0};
      const std::int64_t count =
          std::min(left, static_cast<std::int64_t>(size));
      std::memset(buffer, 'x', static_cast<std::size_t>(count));
      left -= count;
      if (count > 0) return count;
      left = -1;
      *static_cast<char*>(buffer) = '\n';
      return std::int64_t{1};
    };
  }
  LongLine(const LongLine&) = delete;
  LongLine& operator=(const LongLine&) = delete;
  ~LongLine() { zxplat::files.read = zxplat::system_files.read; }

 private:
  static inline std::int64_t left;
};

class zxbfile_slow : public zxbfile {};

TEST_F(zxbfile_slow, the_longest_line_has_2147483600_bytes) {
  if (sizeof(void*) < 8) GTEST_SKIP() << "no memory for a line of 2 GiB";
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxStr text;
  {
    const LongLine longest(2'147'483'599);
    EXPECT_TRUE(file.gets(text));
    EXPECT_EQ(text.length(), 2'147'483'600);
    EXPECT_EQ(text[2'147'483'599], '\n');
    EXPECT_EQ(text[2'147'483'598], 'x');
    EXPECT_EQ(file.lines, 1);
  }
  const std::string message = "fgets: read ovr 32k (" + path + ")";
  {
    const LongLine too_long(2'147'483'600);
    expect_failure([&] { file.gets(text); }, 2005, message, path);
    EXPECT_TRUE(text.is_empty());
  }
  EXPECT_TRUE(file.gets(text));
  EXPECT_TRUE(text == "\n");  // what did not fit any more
  const LongLine endless(INT64_MAX);
  kit::with_failures_dropped([&] { EXPECT_FALSE(file.gets(text)); });
  EXPECT_TRUE(text.is_empty());
  EXPECT_TRUE(file.is_open());
}

// ---- positions

TEST_F(zxbfile, positions_count_from_the_start) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  EXPECT_TRUE(file.seek(4));
  EXPECT_EQ(file.tell(), 4);
  EXPECT_EQ(read(file, 2), "45");
  EXPECT_EQ(file.tell(), 6);
  EXPECT_TRUE(file.seek_end());
  EXPECT_EQ(file.tell(), 10);
  EXPECT_TRUE(file.seek(100));
  EXPECT_EQ(file.tell(), 100);
  EXPECT_EQ(read(file, 2), "");
  file.seek(0);
  EXPECT_EQ(read(file, 20), k_bytes);
}

TEST_F(zxbfile, a_seek_to_the_start_alone_takes_the_lines_back) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  file.puts("ab");
  file.puts("cd");
  file.seek(1);
  file.seek_end();
  EXPECT_EQ(file.lines, 2);
  file.seek(0);
  EXPECT_EQ(file.lines, 0);
}

TEST_F(zxbfile, a_negative_position_fails_an_assertion) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  file.seek(3);
  EXPECT_ASSERTION(file.seek(-1), "zxbfile");
  EXPECT_ASSERTION(file.seek(INT32_MIN), "zxbfile");
  kit::with_failures_dropped([&] { EXPECT_FALSE(file.seek(-1)); });
  EXPECT_EQ(file.tell(), 3);
}

TEST_F(zxbfile, a_failed_seek_is_fatal_and_shows_the_name_in_the_line) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  file.puts("x");
  ASSERT_TRUE(file.handle->flush());
  Faults faults;
  faults.fail_all(Call::seek);
  expect_failure_with_details([&](const BailDetail& d) { file.seek(0, d); },
                              1012, "seek: operation failed", path);
  EXPECT_EQ(file.lines, 1);
  EXPECT_FALSE(file.try_seek(0));
  EXPECT_EQ(file.lines, 1);
  expect_failure_with_details([&](const BailDetail& d) { file.seek_end(d); },
                              1012, "seek: operation failed", path);
}

TEST_F(zxbfile, a_try_to_seek_is_a_seek_that_may_fail) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  file.puts("a");
  EXPECT_TRUE(file.try_seek(1));
  EXPECT_EQ(file.lines, 1);
  EXPECT_EQ(read(file, 2), "12");
  EXPECT_TRUE(file.try_seek(0));
  EXPECT_EQ(file.lines, 0);
  EXPECT_TRUE(file.try_seek(INT32_MAX));
  EXPECT_EQ(file.tell(), INT32_MAX);
  EXPECT_ASSERTION(file.try_seek(-1), "zxbfile");
  kit::with_failures_dropped([&] { EXPECT_FALSE(file.try_seek(-1)); });
  EXPECT_EQ(file.tell(), INT32_MAX);
}

TEST_F(zxbfile, a_position_that_the_system_does_not_tell_is_fatal) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  Faults faults;
  faults.fail_all(Call::seek);
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(file.seek(5000));
    EXPECT_FALSE(file.seek_end());
  });
  expect_failure_with_details([&](const BailDetail& d) { file.tell(d); }, 1013,
                              "getpos: operation failed", path);
  kit::with_failures_dropped([&] { EXPECT_EQ(file.tell(), -1); });
}

// A file whose end is where the test says.
class EndAt {
 public:
  explicit EndAt(std::int64_t place) {
    end = place;
    zxplat::files.seek = [](zxplat::Fd, std::int64_t, zxplat::Whence) {
      return end;
    };
  }
  EndAt(const EndAt&) = delete;
  EndAt& operator=(const EndAt&) = delete;
  ~EndAt() { zxplat::files.seek = zxplat::system_files.seek; }

 private:
  static inline std::int64_t end;
};

TEST_F(zxbfile, a_position_beyond_31_bits_is_fatal) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  {
    const EndAt last(0x7FFF'FFFF);
    file.seek_end();
    EXPECT_EQ(file.tell(), 0x7FFF'FFFF);
  }
  for (const std::int64_t end : {0x8000'0000LL, 0x1'0000'0000LL}) {
    const EndAt beyond(end);
    file.seek_end();
    expect_failure_with_details([&](const BailDetail& d) { file.tell(d); },
                                1013, "getpos: operation failed", path);
    kit::with_failures_dropped([&] { EXPECT_EQ(file.tell(), -1); });
  }
}

// ---- the file's size

TEST_F(zxbfile, the_length_is_what_the_system_has) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_EQ(file.length(), 10);
  file.seek_end();
  write(file, "abc");
  EXPECT_EQ(file.length(), 10);
  file.flush();
  EXPECT_EQ(file.length(), 13);
  EXPECT_EQ(file.length(no_detail), 13);
  EXPECT_EQ(file.tell(), 13);
}

TEST_F(zxbfile, a_length_that_is_not_told_is_minus_one_or_fatal) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  Faults faults;
  faults.fail_all(Call::size);
  EXPECT_EQ(file.length(), -1);
  expect_failure_with_details([&](const BailDetail& d) { file.length(d); },
                              1019, "filelength: operation failed", path);
  kit::with_failures_dropped([&] { EXPECT_EQ(file.length(no_detail), -1); });
}

// A file that is as long as the test says.
class LengthIs {
 public:
  explicit LengthIs(std::int64_t bytes) {
    length = bytes;
    zxplat::files.size = [](zxplat::Fd) { return length; };
  }
  LengthIs(const LengthIs&) = delete;
  LengthIs& operator=(const LengthIs&) = delete;
  ~LengthIs() { zxplat::files.size = zxplat::system_files.size; }

 private:
  static inline std::int64_t length;
};

TEST_F(zxbfile, a_length_beyond_31_bits_is_a_failure) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  {
    const LengthIs last(0x7FFF'FFFF);
    EXPECT_EQ(file.length(), 0x7FFF'FFFF);
    EXPECT_EQ(file.length(no_detail), 0x7FFF'FFFF);
  }
  for (const std::int64_t length : {0x8000'0000LL, 0x1'0000'0000LL}) {
    const LengthIs beyond(length);
    EXPECT_EQ(file.length(), -1);
    expect_failure_with_details([&](const BailDetail& d) { file.length(d); },
                                1019, "filelength: operation failed", path);
  }
}

TEST_F(zxbfile, a_file_is_cut_and_widened_and_the_position_stays) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  file.seek(2);
  write(file, "ab");
  file.chsize(6);
  EXPECT_EQ(bytes(), "01ab45");
  EXPECT_EQ(file.tell(), 4);
  EXPECT_EQ(read(file, 20), "45");
  file.chsize(3);
  EXPECT_EQ(file.tell(), 6);
  EXPECT_EQ(read(file, 20), "");
  file.chsize(8);
  EXPECT_EQ(file.length(), 8);
  EXPECT_EQ(read(file, 20), std::string(2, '\0'));
  file.chsize(0);
  EXPECT_EQ(bytes(), "");
}

TEST_F(zxbfile, a_size_that_cannot_be_set_is_fatal) {
  const std::string message = "chsize: operation failed";
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  expect_failure_with_details([&](const BailDetail& d) { file.chsize(5, d); },
                              1023, message, path);
  file.close();
  ASSERT_TRUE(file.open_rw(name));
  for (const std::int32_t size : {-1, INT32_MIN})
    expect_failure([&] { file.chsize(size); }, 1023, message, path);
  for (const Call call : {Call::set_size, Call::write}) {
    SCOPED_TRACE(kit::name_of(call));
    write(file, "x");
    Faults faults;
    faults.fail_nth(call, 1);
    expect_failure([&] { file.chsize(5); }, 1023, message, path);
  }
  kit::with_failures_dropped([&] { file.chsize(-1); });
  EXPECT_EQ(file.length(), 10);
  EXPECT_FALSE(file.close());  // a byte was lost
}

// ---- locks

TEST_F(zxbfile, objects_of_one_process_exclude_each_other) {
  zxBFile a;
  zxBFile b;
  ASSERT_TRUE(a.open_rw(name));
  ASSERT_TRUE(b.open_rw(name));
  EXPECT_TRUE(a.lock(2, 3));
  for (zxBFile* file : {&a, &b}) {
    zxplat::set_last_error(0);
    EXPECT_FALSE(file->lock(4, 2));
    EXPECT_EQ(zxplat::last_error(), zxplat::k_err_lock);
  }
  EXPECT_TRUE(b.lock(5, 2));
  EXPECT_FALSE(a.lock(0, 100));
  a.unlock(2, 3);
  EXPECT_TRUE(b.lock(2, 3));
  b.close(no_detail);
  EXPECT_TRUE(a.lock(0, 100));
}

TEST_F(zxbfile, a_lock_flushes_and_moves_to_its_place) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_EQ(read(file, 3), "012");
  file.puts("x");
  const Faults calls;
  EXPECT_TRUE(file.lock(5, 1));
  EXPECT_EQ(calls.count(Call::write), 1);
  EXPECT_EQ(file.tell(), 5);
  EXPECT_EQ(file.lines, 1);
  EXPECT_EQ(read(file, 1), "5");
  write(file, "y");
  file.unlock(5, 1);
  EXPECT_EQ(calls.count(Call::write), 2);
  EXPECT_EQ(file.tell(), 5);
  EXPECT_EQ(file.lines, 1);
  EXPECT_EQ(bytes(), "012x45y789");
  EXPECT_TRUE(file.lock(0, 1));
  EXPECT_EQ(file.lines, 0);
  file.puts("A");
  file.unlock(0, 1);
  EXPECT_EQ(file.lines, 0);
}

// All of the file is in the buffer each time when another writes to it.
TEST_F(zxbfile, behind_a_lock_and_an_unlock_nothing_stale_is_read) {
  const auto overwrite = [&](std::string_view text) {
    zxBFile other;
    ASSERT_TRUE(other.open_rw(name));
    write(other, text);
    other.close(no_detail);
  };
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_EQ(read(file, 10), k_bytes);
  overwrite("abcdefghij");
  file.seek(3);
  EXPECT_EQ(read(file, 1), "3");
  EXPECT_TRUE(file.lock(10, 1));
  file.seek(0);
  EXPECT_EQ(read(file, 10), "abcdefghij");
  overwrite("ABCDEFGHIJ");
  file.unlock(10, 1);
  file.seek(0);
  EXPECT_EQ(read(file, 10), "ABCDEFGHIJ");
}

TEST_F(zxbfile, no_bytes_are_locked_without_a_call) {
  zxBFile file;
  ASSERT_TRUE(file.open(name));  // which natively could not lock
  const Faults calls;
  EXPECT_TRUE(file.lock(4, 0));
  EXPECT_TRUE(file.lock(4, 0));
  file.unlock(4, 0);
  file.unlock(4, 0);
  EXPECT_EQ(calls.count(Call::lock) + calls.count(Call::unlock), 0);
  EXPECT_EQ(file.tell(), 4);
}

TEST_F(zxbfile, what_is_not_exactly_locked_cannot_be_unlocked) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_TRUE(file.lock(2, 3));
  const std::string message = "unlock: " + quoted(path) + " operation failed";
  for (const auto& [place, size] :
       std::vector<std::pair<int, int>>{{0, 1}, {2, 2}, {3, 2}, {2, 4}}) {
    expect_failure_with_details(
        [&, at = place, n = size](const BailDetail& d) {
          file.unlock(at, n, d);
        },
        1022, message, path);
  }
  file.unlock(2, 3);
  expect_failure([&] { file.unlock(2, 3); }, 1022, message, path);
}

TEST_F(zxbfile, a_negative_place_of_a_lock_fails_an_assertion) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_ASSERTION(file.lock(-1, 1), "zxbfile");
  EXPECT_ASSERTION(file.unlock(-1, 1), "zxbfile");
  kit::with_failures_dropped([&] {
    EXPECT_FALSE(file.lock(-1, 1));
    file.unlock(-1, 1);
  });
  EXPECT_TRUE(file.lock(INT32_MAX, INT32_MAX));
  file.unlock(INT32_MAX, INT32_MAX);
}

TEST_F(zxbfile, a_lock_that_fails_otherwise_is_fatal) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  const std::string flush = "lock: bad file/flush " + quoted(path);
  const std::string failed = "lock: " + quoted(path) + " operation failed";
  for (const BailDetail& detail : {no_detail, k_detail}) {
    write(file, "x");
    Faults faults;
    faults.fail_nth(Call::write, 1);
    expect_failure([&] { file.lock(0, 1, detail); }, 1033, flush, path, detail);
  }
  Faults faults;
  faults.fail_nth(Call::lock, 1, zxplat::k_err_io);
  expect_failure([&] { file.lock(0, 1, k_detail); }, 1021, failed, path,
                 k_detail);
  faults.fail_nth(Call::lock, 1, zxplat::k_err_lock);
  EXPECT_FALSE(file.lock(0, 1));
  faults.fail_nth(Call::seek, 1);
  expect_failure([&] { file.lock(7, 1); }, 1012, "seek: operation failed",
                 path);
  kit::with_failures_dropped([&] {
    faults.fail_nth(Call::lock, 1, zxplat::k_err_io);
    EXPECT_FALSE(file.lock(0, 1));
    faults.fail_nth(Call::seek, 1);
    EXPECT_FALSE(file.lock(7, 1));
  });
  EXPECT_TRUE(file.lock(0, 1));
  faults.fail_nth(Call::unlock, 1, zxplat::k_err_io);
  expect_failure([&] { file.unlock(0, 1); }, 1022,
                 "unlock: " + quoted(path) + " operation failed", path);
  write(file, "x");
  faults.fail_nth(Call::write, 1);
  expect_failure([&] { file.unlock(0, 1, k_detail); }, 1092,
                 "unlock: " + quoted(path) + " file error", path, k_detail);
  file.unlock(0, 1);
  EXPECT_FALSE(file.close());
}

TEST_F(zxbfile, a_native_lock_is_for_those_who_may_write) {
  if (kit::on_windows()) GTEST_SKIP() << "readers lock as well";
  zxBFile file;
  ASSERT_TRUE(file.open(name));
  zxplat::set_last_error(0);
  kit::with_failures_dropped([&] { EXPECT_FALSE(file.lock(0, 1)); });
  EXPECT_EQ(zxplat::last_error(), zxplat::k_err_denied);
  expect_failure([&] { file.lock(0, 1); }, 1021,
                 "lock: " + quoted(path) + " operation failed", path);
}

// Locks `argv[3]` bytes of a file from `argv[2]` on, and says whether it
// could.  The end of the process unlocks.
ZX_CASE(zxbfile_locks) {
  init_zxlib_args(argc, argv);
  zxBFile file;
  file.open_rw_or_die(argv[1]);
  const bool is_locked = file.lock(std::atoi(argv[2]), std::atoi(argv[3]));
  const bool is_violation = zxplat::last_error() == zxplat::k_err_lock;
  g_stdout.puts(is_locked ? "locked" : is_violation ? "held" : "failed");
  return 0;
}

TEST_F(zxbfile, a_lock_keeps_other_processes_out) {
  zxBFile file;
  ASSERT_TRUE(file.open_rw(name));
  EXPECT_TRUE(file.lock(2, 3));
  const auto other = [&](int place, int size) {
    return kit::run_case("zxbfile_locks",
                         {path, std::to_string(place), std::to_string(size)})
        .out;
  };
  EXPECT_EQ(other(2, 3), "held");
  EXPECT_EQ(other(4, 1), "held");
  EXPECT_EQ(other(0, 100), "held");
  EXPECT_EQ(other(0, 2), "locked");
  EXPECT_EQ(other(5, 100), "locked");
  EXPECT_TRUE(file.lock(0, 2));  // the others are gone
  file.unlock(2, 3);
  EXPECT_EQ(other(2, 3), "locked");
  file.close(no_detail);
  EXPECT_EQ(other(0, 100), "locked");
}

// ---- random operations

// A file and the lines of it that were counted.
struct Model : FileModel {
  std::int32_t lines = 0;

  std::string line() {
    const std::size_t feed =
        at < bytes.size() ? bytes.find('\n', at) : std::string::npos;
    const std::string got = feed == std::string::npos ? read(bytes.size() + 1)
                                                      : read(feed + 1 - at);
    if (!got.empty()) ++lines;
    return got;
  }

  void seek(std::size_t place) {
    FileModel::seek(place);
    if (place == 0) lines = 0;
  }
};

// Carries the same random operations out on an object and on its model.
class Duel {
 public:
  Duel(const std::string& path, unsigned seed) : random(seed) {
    model.bytes = text(random() % 40'000);
    write_file(path, model.bytes);
    file.open_rw_or_die(path.c_str());
  }

  void step() {
    (this->*k_operations[below(std::size(k_operations))])();
    ASSERT_EQ(file.eof(), model.met_end);
    ASSERT_EQ(file.lines, model.lines);
  }

  bool close() { return file.close(); }

  Model model;

 private:
  using Operation = void (Duel::*)();
  static const Operation k_operations[20];

  std::size_t below(std::size_t limit) { return random() % limit; }

  // Mostly small, now and then more than a buffer.
  std::size_t size() {
    const std::size_t kind = below(1000);
    if (kind < 3) return 65'530 + below(12);
    return kind < 50 ? below(10'000) : below(200);
  }

  std::int32_t place() {
    return static_cast<std::int32_t>(below(model.bytes.size() + 50));
  }

  // Lines of some thirty bytes, and every byte in them.
  std::string text(std::size_t length) {
    std::string bytes(length, '\0');
    for (char& byte : bytes)
      byte = below(30) == 0 ? '\n' : static_cast<char>(random() & 0xFF);
    return bytes;
  }

  void read() {
    std::string room(size(), '?');
    std::int32_t got = -1;
    const bool is_read =
        file.read(room.data(), static_cast<std::int32_t>(room.size()), &got);
    const std::string expected = model.read(room.size());
    ASSERT_EQ(got, static_cast<std::int32_t>(expected.size()));
    ASSERT_EQ(is_read, room.empty() || !expected.empty());
    ASSERT_TRUE(room.substr(0, expected.size()) == expected);
  }

  void read_all() {
    const std::size_t left =
        model.bytes.size() - std::min(model.at, model.bytes.size());
    std::string room(std::min(size(), left), '?');
    ASSERT_TRUE(file.read_all(room.data(), room.size()));
    ASSERT_TRUE(room == model.read(room.size()));
  }

  void try_read() {
    std::string room(size(), '?');
    const bool is_read =
        file.try_read(room.data(), static_cast<std::int32_t>(room.size()));
    const std::string expected = model.read(room.size());
    ASSERT_EQ(is_read, expected.size() == room.size());
    ASSERT_TRUE(room.substr(0, expected.size()) == expected);
  }

  void read_str() {
    const std::size_t wanted = size();
    const bool is_read = file.read_str(line, static_cast<std::int32_t>(wanted));
    const std::string expected = model.read(wanted);
    ASSERT_EQ(is_read, wanted == 0 || !expected.empty());
    ASSERT_TRUE(line.view() == expected);
  }

  void write() {
    const std::string bytes = text(size());
    file.write(bytes.data(), bytes.size());
    model.write(bytes);
  }

  void try_write() {
    const std::string bytes = text(size());
    ASSERT_TRUE(
        file.try_write(bytes.data(), static_cast<std::int32_t>(bytes.size())));
    model.write(bytes);
  }

  void getc() {
    for (std::size_t left = below(50); left > 0; --left) {
      const std::string byte = model.read(1);
      ASSERT_EQ(file.getc(),
                byte.empty() ? -1 : static_cast<unsigned char>(byte[0]));
    }
  }

  void putc() {
    for (const char byte : text(below(50))) {
      ASSERT_EQ(file.putc(byte), static_cast<unsigned char>(byte));
      model.write({&byte, 1});
    }
  }

  void gets() {
    for (std::size_t left = below(10); left > 0; --left) {
      const bool has_line = file.gets(line);
      const std::string expected = model.line();
      ASSERT_EQ(has_line, !expected.empty());
      ASSERT_TRUE(line.view() == expected);
    }
    if (below(4) == 0) kept = line;  // which is shared then
  }

  void puts() {
    const std::string bytes = text(below(100));
    file.puts(zxStr(std::string_view(bytes)));
    model.write(bytes);
    ++model.lines;
  }

  void newline() {
    ASSERT_TRUE(file.newline());
    model.write("\r\n");
  }

  void seek() {
    const std::int32_t to = below(20) == 0 ? 0 : place();
    file.seek(to);
    model.seek(static_cast<std::size_t>(to));
  }

  void try_seek() {
    const auto near = static_cast<std::int32_t>(below(200));
    const auto at = static_cast<std::int32_t>(model.at);
    const std::int32_t to = std::max(at - 100 + near, 0);
    ASSERT_TRUE(file.try_seek(to));
    model.seek(static_cast<std::size_t>(to));
  }

  // An empty file's end is not asked for as its start.
  void seek_end() {
    file.seek_end();
    const std::int32_t kept_lines = model.lines;
    model.seek(model.bytes.size());
    model.lines = kept_lines;
  }

  void tell() { ASSERT_EQ(file.tell(), static_cast<std::int32_t>(model.at)); }

  void length() {
    file.flush();
    ASSERT_EQ(file.length(), static_cast<std::int32_t>(model.bytes.size()));
  }

  void chsize() {
    const std::size_t wanted =
        std::min(below(2 * model.bytes.size() + 10), std::size_t{60'000});
    file.chsize(static_cast<std::int32_t>(wanted));
    model.bytes.resize(wanted);
  }

  void lock() {
    const std::int32_t at = place();
    const auto count = static_cast<std::int32_t>(below(100));
    ASSERT_TRUE(file.lock(at, count));
    file.unlock(at, count);
    model.seek(static_cast<std::size_t>(at));
  }

  std::mt19937 random;
  zxBFile file;
  zxStr line;
  zxStr kept;
};

const Duel::Operation Duel::k_operations[] = {
    &Duel::read,     &Duel::read_all,  &Duel::try_read, &Duel::read_str,
    &Duel::write,    &Duel::try_write, &Duel::getc,     &Duel::putc,
    &Duel::gets,     &Duel::puts,      &Duel::newline,  &Duel::seek,
    &Duel::try_seek, &Duel::seek_end,  &Duel::tell,     &Duel::length,
    &Duel::chsize,   &Duel::lock,      &Duel::gets,     &Duel::seek,
};

void fight(const std::string& path, unsigned seed, int steps) {
  SCOPED_TRACE(testing::Message() << "seed " << seed);
  Duel duel(path, seed);
  for (int i = 0; i < steps; ++i) {
    SCOPED_TRACE(testing::Message() << "step " << i);
    duel.step();
    if (testing::Test::HasFatalFailure()) return;
  }
  ASSERT_TRUE(duel.close());
  ASSERT_TRUE(read_file(path) == duel.model.bytes);
}

TEST_F(zxbfile, random_operations_do_what_they_do_to_a_string) {
  for (unsigned seed = 1; seed <= 100; ++seed) {
    fight(path, seed, 1000);
    if (HasFatalFailure()) return;
  }
}

TEST_F(zxbfile, random_operations_with_short_writes_come_out_alike) {
  Faults faults;
  faults.limit_writes(100);
  for (unsigned seed = 1001; seed <= 1010; ++seed) {
    fight(path, seed, 500);
    if (HasFatalFailure()) return;
  }
}

TEST_F(zxbfile_slow, many_random_operations_do_what_they_do_to_a_string) {
  for (unsigned seed = 100'001; seed <= 101'000; ++seed) {
    fight(path, seed, 2000);
    if (HasFatalFailure()) return;
  }
}

// ---- closing

TEST_F(zxbfile, closing_writes_down_what_is_left) {
  zxBFile file;
  file.create(missing_name);
  write(file, "abc");
  EXPECT_EQ(read_file(missing), "");
  EXPECT_TRUE(file.close());
  EXPECT_EQ(read_file(missing), "abc");
}

TEST_F(zxbfile, a_failed_close_leaves_a_closed_object_without_a_name) {
  for (const Call call : {Call::write, Call::close}) {
    SCOPED_TRACE(kit::name_of(call));
    zxBFile file;
    file.create(missing_name);
    write(file, "abc");
    Faults faults;
    faults.fail_all(call);
    EXPECT_FALSE(file.close());
    EXPECT_FALSE(file.is_open());
    EXPECT_TRUE(file.name.is_empty());
    EXPECT_EQ(faults.count(Call::close), 1);
    EXPECT_TRUE(file.close());
  }
}

// Everything lies in the statement: what the failure leaves behind would
// count as lost otherwise.
void create_and_fail_to_close(const std::string& path,
                              const std::function<void(zxBFile&)>& close) {
  alignas(zxBFile) std::byte room[sizeof(zxBFile)];
  zxBFile* file = ::new (room) zxBFile;
  file->create(path.c_str());
  file->puts("abc");
  Faults faults;
  faults.fail_all(Call::close);
  close(*file);
}

TEST_F(zxbfile, a_failed_close_with_a_detail_is_fatal_with_the_old_name) {
  const std::string message = "close: " + quoted(missing) + " failed";
  expect_failure_with_details(
      [&](const BailDetail& d) {
        create_and_fail_to_close(missing, [&](zxBFile& f) { f.close(d); });
      },
      1010, message, missing);
  zxplat::files = zxplat::system_files;  // the faults were jumped over
  EXPECT_EQ(read_file(missing), "abc");
}

TEST_F(zxbfile, a_destructor_that_cannot_close_is_fatal) {
  expect_failure(
      [&] {
        create_and_fail_to_close(missing,
                                 [](zxBFile& f) { std::destroy_at(&f); });
      },
      1010, "close: " + quoted(missing) + " failed", missing);
  zxplat::files = zxplat::system_files;
}

TEST_F(zxbfile, a_destructor_closes) {
  const Faults calls;
  {
    zxBFile file;
    file.create(missing_name);
    write(file, "abc");
  }
  EXPECT_EQ(calls.count(Call::close), 1);
  EXPECT_EQ(read_file(missing), "abc");
}

TEST_F(zxbfile, a_dropped_failure_to_close_leaves_a_closed_object) {
  kit::with_failures_dropped([&] {
    zxBFile file;
    file.create(missing_name);
    write(file, "abc");
    Faults faults;
    faults.fail_all(Call::close);
    file.close(no_detail);
    EXPECT_FALSE(file.is_open());
    EXPECT_TRUE(file.name.is_empty());
    file.create(missing_name);
    write(file, "def");
  });  // the destructor fails as well
  EXPECT_EQ(read_file(missing), "def");
}

TEST_F(zxbfile, an_object_can_be_used_again_and_again) {
  zxBFile file;
  for (int i = 0; i < 3; ++i) {
    file.create(name);
    file.puts("abc");
    file.close(no_detail);
    ASSERT_TRUE(file.open(name));
    EXPECT_EQ(file.lines, 0);
    EXPECT_EQ(read(file, 10), "abc");
    EXPECT_TRUE(file.close());
  }
}

TEST_F(zxbfile, a_full_device_is_told_at_the_close) {
  const std::string device = kit::full_device();
  if (device.empty()) GTEST_SKIP() << "the system has no full device";
  zxBFile file;
  file.create(device.c_str());
  file.puts("abc");
  EXPECT_FALSE(file.close());
}

}  // namespace
