// zxsys2_safety_test.cpp - what copying, moving and walking must never do:
// lose a source, act on another file than the one named, go on for ever.
// Tests zxlib/zxsys2.h, zxnextf.h and the platform behind them.

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

#include "kit/failure.h"
#include "kit/faults.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "zxisfile.h"
#include "zxnextf.h"
#include "zxplat.h"
#include "zxsys2.h"

namespace {

namespace fs = std::filesystem;

using kit::Call;
using kit::Faults;
using kit::make_read_only;
using kit::names_in;
using kit::read_file;
using kit::TempDir;
using kit::WorkingIn;
using kit::write_file;
using Names = std::vector<std::string>;

// What the files of a folder hold, one after the other.
std::string all_in(const std::string& folder) {
  std::string all;
  for (const std::string& name : names_in(folder))
    all += read_file(folder + "/" + name);
  return all;
}

// ---- one file under both names

TEST(zxsys2_safety, a_file_copied_onto_itself_is_as_before) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a", "text");
  cpfile("a", "a");
  cpfile("a", ".\\a");
  EXPECT_EQ(names_in("."), Names{"a"});
  EXPECT_EQ(read_file("a"), "text");
}

TEST(zxsys2_safety, a_copy_of_a_file_onto_itself_stays_if_it_gets_no_name) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a", "text");
  {
    Faults faults;
    faults.fail_nth(Call::rename, 1);
    EXPECT_FAILURE(cpfile("a", "a"),
                   "1038: cpfile: failed to rename tmp to 'a'",
                   "[1038-1038-0/E-0/E/a/]");
  }
  EXPECT_EQ(all_in("."), "text");
  EXPECT_EQ(names_in(".").size(), 1U);
}

TEST(zxsys2_safety, a_link_copied_onto_its_file_keeps_the_bytes) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("real", "text");
  if (!kit::make_link("real", "link")) GTEST_SKIP() << "no links here";
  {
    Faults faults;
    faults.fail_nth(Call::rename, 1);
    kit::failure_of([] { cpfile("link", "real"); });
  }
  std::string all;
  for (const std::string& name : names_in("."))
    if (fs::exists(name)) all += read_file(name);
  EXPECT_EQ(all, "text");
}

// ---- copies that cannot take their place

TEST(zxsys2_safety, a_copy_without_write_permission_is_deleted_too) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a", "text");
  make_read_only("a");
  fs::create_directory("b");
  EXPECT_FAILURE(cpfile("a", "b"), "1027: delefile: cant del 'b'",
                 "[1027-1027-0/E-0/E/b/]");
  EXPECT_EQ(names_in("."), (Names{"a", "b"}));
}

TEST(zxsys2_safety, permission_to_write_can_be_given) {
  const TempDir folder;
  const std::string name = folder.file("a");
  write_file(name, "text");
  make_read_only(name);
  EXPECT_FALSE(zxplat::files.remove(name));
  EXPECT_TRUE(zxplat::make_writable(name));
  EXPECT_TRUE(zxplat::files.remove(name));
  EXPECT_FALSE(zxplat::make_writable(name));
  EXPECT_EQ(zxplat::last_error(), zxplat::k_err_not_found);
}

// ---- names that are more than names

TEST(zxsys2_safety, a_file_called_minus_is_moved_and_no_stream) {
  const std::string far = kit::other_device_folder();
  if (far.empty()) GTEST_SKIP() << "there is no other device here";
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("-", "text");
  const std::string target = far + "/zxsys2_safety_minus";
  move_file("-", target.c_str());
  EXPECT_EQ(read_file(target), "text");
  EXPECT_TRUE(names_in(".").empty());
  fs::remove(target);
}

TEST(zxsys2_safety, a_file_called_minus_is_copied) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("-", "text");
  cpfile("-", "copy");
  EXPECT_EQ(read_file("copy"), "text");
  EXPECT_EQ(read_file("-"), "text");
}

TEST(zxsys2_safety, the_null_device_is_no_source_of_a_move) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a", "text");
  for (const char* name : {"nul", "NUL", "nUl"}) {
    EXPECT_TRUE(zxplat::is_null_device(name));
    EXPECT_FAILURE(
        move_file(name, "a"),
        std::string("1002: open: Can't open file '") + name + "' for reading",
        std::string("[1002-1002-0/E-0/E/") + name + "/]");
  }
  EXPECT_EQ(read_file("a"), "text");
  EXPECT_EQ(names_in("."), Names{"a"});
  for (const char* name : {"", "nu", "null", "nul.", "mul", ".\\nul"})
    EXPECT_FALSE(zxplat::is_null_device(name)) << name;
}

TEST(zxsys2_safety, names_that_windows_does_not_have_are_refused_everywhere) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a", "text");
  for (const char byte : std::string("*?\"<>|")) {
    const zxStr name = zxStr("x") + byte;
    EXPECT_FALSE(str2file(name, "text")) << byte;
    EXPECT_EQ(zxplat::last_error(), zxplat::k_err_bad_name) << byte;
    EXPECT_FALSE(try_createdir(name)) << byte;
    EXPECT_EQ(zxplat::last_error(), zxplat::k_err_bad_name) << byte;
    EXPECT_EQ(zxplat::files.rename("a", name.view()),
              zxplat::RenameResult::failed);
    EXPECT_EQ(zxplat::last_error(), zxplat::k_err_bad_name) << byte;
  }
  EXPECT_EQ(names_in("."), Names{"a"});
}

// ---- folders alike but for their case

TEST(zxsys2_safety, a_walk_stays_in_the_folder_that_was_named) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  fs::create_directories("OUT");
  if (fs::exists("out")) GTEST_SKIP() << "case does not count here";
  fs::create_directories("out");
  write_file("OUT/A.txt", "1");
  write_file("out/a.txt", "2");
  zxQVA<zxStr> list;
  list.append("OUT\\*");
  zxStr name;
  EXPECT_TRUE(next_file(list, name));
  EXPECT_TRUE(name == "OUT\\a.txt") << name.c_str();
  EXPECT_FALSE(next_file(list, name));
  delfiles("OUT\\*");
  EXPECT_TRUE(names_in("OUT").empty());
  EXPECT_EQ(names_in("out"), Names{"a.txt"});
}

// ---- what does not end

// A source that gives bytes for ever, at little cost.
std::int64_t read_for_ever(zxplat::Fd, void*, std::size_t size) {
  return static_cast<std::int64_t>(size);
}

TEST(zxsys2_safety, a_source_without_an_end_is_given_up) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a", "");
  zxBFile in("a");
  zxBFile out;
  out.create("nul");
  zxplat::files.read = read_for_ever;
  EXPECT_FAILURE(copy_stream(in, out), "1014: read: 'a' operation failed",
                 "[1014-1014-0/E-0/E/a/]");
  zxplat::files = zxplat::system_files;
}

TEST(zxsys2_safety, a_copy_ends_when_its_target_is_full) {
  const TempDir folder;
  const WorkingIn there(folder.path());
  write_file("a", std::string(1'000'000, 'x'));
  zxBFile in("a");
  zxBFile out;
  out.create("b");
  {
    Faults faults;
    faults.fail_all(Call::write, zxplat::k_err_disk_full);
    kit::with_failures_dropped([&] { copy_stream(in, out); });
    EXPECT_EQ(faults.count(Call::write), 1);
  }
  EXPECT_FALSE(out.close());
}

TEST(zxsys2_safety, a_path_of_more_folders_than_a_name_holds_is_none) {
  std::string name;
  while (name.size() <= zxplat::k_max_name) name += "x\\";
  EXPECT_FALSE(make_path(name.c_str()));
}

// ---- others are faster

std::string rival_folder;

bool make_folder_behind_a_rival(std::string_view name) {
  fs::create_directory(rival_folder);
  return zxplat::system_files.make_folder(name);
}

TEST(zxsys2_safety, a_folder_that_another_process_makes_counts_as_made) {
  const TempDir folder;
  rival_folder = folder.file("new");
  zxplat::files.make_folder = make_folder_behind_a_rival;
  EXPECT_TRUE(make_path((folder.path() + "\\new\\deep").c_str()));
  zxplat::files = zxplat::system_files;
  EXPECT_TRUE(fs::is_directory(folder.path() + "/new/deep"));
}

}  // namespace
