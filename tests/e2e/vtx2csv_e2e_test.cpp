// vtx2csv_e2e_test.cpp - runs of the export tool as a process: obautil/
// vtx2csv/vtx2csv.cpp with all that is below it.
//
// What goes into the rows is tested in obautil/vtx2csv_test.cpp and by
// export_check.py; here it is options, names, exit codes, the texts on the
// screen and what stays of the files.
#include <gtest/gtest.h>

#include <cctype>
#include <chrono>
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

#include "e2e/tool_run.h"

namespace {

namespace fs = std::filesystem;

using kit::ProcessResult;
using table_bytes::Record;
using table_bytes::security;
using namespace tool_run;

constexpr char k_old[] = "the file of yesterday";

class vtx2csv_e2e : public testing::Test {
 protected:
  void SetUp() override {
    if (!has_programs()) GTEST_SKIP() << k_no_programs;
    place.make_table(small_table());
  }

  ProcessResult run(const std::vector<std::string>& arguments) const {
    return place.run(k_tool, arguments);
  }
  // For runs that fail.
  ProcessResult run_quick(const std::vector<std::string>& arguments) const {
    return place.run(k_quick_tool, arguments);
  }

  std::string read(const std::string& name) const {
    return kit::read_file(place.in_work(name));
  }
  bool exists(const std::string& name) const {
    return fs::exists(place.in_work(name));
  }
  void write_old(const std::string& name) const {
    kit::write_file(place.in_work(name), k_old);
  }

  void expect_success(const ProcessResult& result,
                      const std::string& output) const {
    EXPECT_EQ(result.exit_code, 0);
    EXPECT_EQ(result.out, told(output));
    EXPECT_EQ(result.err, "");
    EXPECT_TRUE(place.temporaries().empty());
  }

  // A failure of the quick tool, ahead of which it said `before`.
  static void expect_failure(const ProcessResult& result,
                             const std::string& message,
                             const std::string& line,
                             const std::string& before = "") {
    EXPECT_EQ(result.exit_code, 100);
    EXPECT_EQ(normal_screen(result.out),
              before + failure_screen(k_quick_tool, message, line));
    EXPECT_EQ(result.err, "");
  }

  // An assertion of a module, at any line.
  static void expect_assertion(const ProcessResult& result,
                               const std::string& module,
                               const std::string& before) {
    EXPECT_EQ(result.exit_code, 100);
    const std::string screen = normal_screen(result.out);
    const std::string start =
        before + "\r\n" + kit::built_program(k_quick_tool) +
        " 1.01a Fatal Error 1000: bailed out: " + module + ":";
    EXPECT_TRUE(screen.starts_with(start)) << screen;
    EXPECT_TRUE(screen.ends_with("]\r\n")) << screen;
  }

  Place place;
};

// ---- runs that succeed

TEST_F(vtx2csv_e2e, without_arguments_everything_is_in_the_working_directory) {
  kit::ProcessOptions options = place.options();
  options.directory = place.table();
  const std::string index = kit::read_file(place.in_table("D4WVTX.IDX"));
  const std::string data = kit::read_file(place.in_table("D4WVTX.BIN"));
  expect_success(place.run(k_tool, {}, options), "r9qvtx.csv");
  EXPECT_EQ(kit::read_file(place.in_table("r9qvtx.csv")), small_csv());
  EXPECT_EQ(kit::read_file(place.in_table("D4WVTX.IDX")), index);
  EXPECT_EQ(kit::read_file(place.in_table("D4WVTX.BIN")), data);
}

TEST_F(vtx2csv_e2e, the_table_and_the_output_can_be_named) {
  write_old("out.csv");
  expect_success(run({"-r9q", place.table(), "out.csv"}), "out.csv");
  EXPECT_EQ(read("out.csv"), small_csv());
  EXPECT_FALSE(exists("r9qvtx.csv"));
}

TEST_F(vtx2csv_e2e, a_second_name_is_ignored) {
  expect_success(run({"-r9q", place.table(), "a.csv", "b.csv", "-?"}), "a.csv");
  EXPECT_EQ(read("a.csv"), small_csv());
  EXPECT_FALSE(exists("b.csv"));
}

TEST_F(vtx2csv_e2e, of_two_directories_the_last_counts) {
  expect_success(run({"-r9q", "none", "-r9q", place.table()}), "r9qvtx.csv");
  EXPECT_EQ(read("r9qvtx.csv"), small_csv());
}

// Arguments behind the directory, and the name that the output gets.
struct Dash {
  std::vector<std::string> arguments;
  std::string output;
};

TEST_F(vtx2csv_e2e, a_dash_can_be_a_name_or_stand_ahead_of_one) {
  const Dash k_rows[] = {
      {{"-"}, "-"},
      {{"--"}, "--"},
      {{"-", "-x.csv"}, "-x.csv"},
      {{"--", "-y.csv"}, "-y.csv"},
      {{"-?-"}, "r9qvtx.csv"},
  };
  for (const Dash& row : k_rows) {
    SCOPED_TRACE(row.arguments[0]);
    std::vector<std::string> arguments = {"-r9q", place.table()};
    arguments.insert(arguments.end(), row.arguments.begin(),
                     row.arguments.end());
    expect_success(run(arguments), row.output);
    EXPECT_EQ(read(row.output), small_csv());
  }
}

TEST_F(vtx2csv_e2e, a_table_without_live_records_is_a_header) {
  place.make_table({security(1, ""), security(2, "")});
  expect_success(run({"-r9q", place.table()}), "r9qvtx.csv");
  EXPECT_EQ(read("r9qvtx.csv"), csv_header());
}

TEST_F(vtx2csv_e2e, the_output_can_go_into_another_folder) {
  fs::create_directory(place.in_work("sub"));
  kit::write_file(place.in_work("sub/two.csv"), k_old);
  for (const std::string output : {"sub\\one.csv", "sub/two.csv"}) {
    SCOPED_TRACE(output);
    expect_success(run({"-r9q", place.table(), output}), output);
  }
  EXPECT_EQ(kit::read_file(place.in_work("sub/one.csv")), small_csv());
  EXPECT_EQ(kit::read_file(place.in_work("sub/two.csv")), small_csv());
}

TEST_F(vtx2csv_e2e, the_output_can_go_to_another_device) {
  const OtherDevice device("e2e");
  if (!device.exists()) GTEST_SKIP() << "there is no other device";
  kit::write_file(device.file("old.csv"), k_old);
  for (const std::string& output :
       {device.file("new.csv"), device.file("old.csv")}) {
    SCOPED_TRACE(output);
    expect_success(run({"-r9q", place.table(), output}), output);
    EXPECT_EQ(kit::read_file(output), small_csv());
  }
  // No copy is left beside them.
  EXPECT_EQ(std::distance(fs::directory_iterator(device.path()), {}), 2);
}

// Wherever a name of the file system has no star, this fails, but it must not
// be taken for the other file's name.
TEST_F(vtx2csv_e2e, a_star_in_an_argument_is_a_star) {
  write_old("old.csv");
  const ProcessResult result = run({"-r9q", place.table(), "o*.csv"});
  EXPECT_TRUE(result.out.starts_with("start converting to o*.csv\r\n"))
      << result.out;
  EXPECT_EQ(read("old.csv"), k_old);
}

TEST_F(vtx2csv_e2e, a_run_without_standard_streams_makes_its_file) {
  kit::ProcessOptions options = place.options();
  options.missing = kit::k_no_input | kit::k_no_output | kit::k_no_errors;
  const ProcessResult result =
      place.run(k_tool, {"-r9q", place.table()}, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(read("r9qvtx.csv"), small_csv());
  EXPECT_EQ(kit::read_file(place.in_table("D4WVTX.BIN")),
            table_bytes::data_bytes(small_table()));
}

// ---- the usage screen

constexpr std::string_view k_usage_start =
    "Usage: VTX2CSV 1.01a [-?] [-r9q directory] [csv-file]\r\n"
    "\r\n"
    "Converts r9qvtx.bin file to csv format\r\n"
    "-r9q - the directory where r9qhist.dat is at. default = use current "
    "dir.\r\n"
    "-? - display this help screen\r\n"
    "\r\n"
    "Program info: obautil/vtx2csv/vtx2csv.cpp Compiled: ";
constexpr std::string_view k_usage_end = "\r\nzx 3.64b test w32  vc\n";

// True for a date and time of the form "Feb 25 2009 19:47:44".
bool is_build_time(std::string_view text) {
  // a: a letter; d: a digit; b: a digit or a blank; others: themselves
  constexpr std::string_view k_form = "aaa bd dddd dd:dd:dd";
  if (text.size() != k_form.size()) return false;
  for (std::size_t i = 0; i < k_form.size(); ++i) {
    const auto c = static_cast<unsigned char>(text[i]);
    const bool fits = k_form[i] == 'a'   ? std::isalpha(c) != 0
                      : k_form[i] == 'd' ? std::isdigit(c) != 0
                      : k_form[i] == 'b' ? std::isdigit(c) != 0 || c == ' '
                                         : text[i] == k_form[i];
    if (!fits) return false;
  }
  return true;
}

void expect_usage(const ProcessResult& result, const std::string& error) {
  EXPECT_EQ(result.exit_code, 1);
  EXPECT_EQ(result.out, "");
  std::string_view screen = result.err;
  const std::string start = error + std::string(k_usage_start);
  ASSERT_TRUE(screen.starts_with(start)) << screen;
  ASSERT_TRUE(screen.ends_with(k_usage_end)) << screen;
  screen.remove_prefix(start.size());
  screen.remove_suffix(k_usage_end.size());
  EXPECT_TRUE(is_build_time(screen)) << screen;
}

struct Usage {
  std::vector<std::string> arguments;
  std::string error;
};

TEST_F(vtx2csv_e2e, the_usage_screen_goes_to_standard_error_with_code_1) {
  const Usage k_rows[] = {
      {{"-?"}, ""},
      {{"-?+"}, ""},
      {{"-r9q", "none", "-?", "out.csv"}, ""},
      {{"-x"}, "Error: bad option: -x\r\n"},
      {{"-?", "--help"}, "Error: bad option: --help\r\n"},
      {{"-r9q"}, "Error: bad or missing parm for -r9q\r\n"},
      {{"-r9q", ""}, "Error: bad or missing parm for -r9q\r\n"},
  };
  for (const Usage& row : k_rows) {
    SCOPED_TRACE(row.arguments.back());
    expect_usage(run(row.arguments), row.error);
  }
  EXPECT_TRUE(fs::is_empty(place.work()));
}

// ---- runs that fail

// What stands on the screen when a table does not open.
std::string init_message(int code) {
  return "ERROR INIT VTX (" + std::to_string(code) + ")";
}
constexpr char k_init_line[] = "[0-0-0/E-0/E/ERROR INIT V/]";

// The one that waits: everything else below leaves the two seconds out.
TEST_F(vtx2csv_e2e, a_failure_stands_for_two_seconds_and_ends_with_100) {
  const auto start = std::chrono::steady_clock::now();
  const ProcessResult result = run({"-r9q", "none"});
  const std::chrono::duration<double> time =
      std::chrono::steady_clock::now() - start;
  EXPECT_EQ(result.exit_code, 100);
  // The numbers of the system aside, every byte.
  EXPECT_EQ(normal_screen(result.out),
            failure_screen(k_tool, init_message(1), k_init_line));
  EXPECT_EQ(result.out.find("\r\n           "), std::string::npos);
  EXPECT_EQ(result.err, "");
  // The clock counts whole seconds, so one of them may be short.
  EXPECT_GE(time.count(), 1);
  EXPECT_LT(time.count(), 30);
}

struct Unopened {
  std::string index;
  std::string data;
  int code;
};

TEST_F(vtx2csv_e2e, a_table_that_does_not_open_is_told_with_its_code) {
  const std::string index = table_bytes::index_bytes({{"A", 1, 55}});
  const Unopened k_rows[] = {
      {index.substr(0, 5), "", 2},
      {index + std::string(24, 'x'), "", 2},
      {index, "short", 5},
      {index, table_bytes::data_head("R9QVTX100"), 6},
  };
  write_old("r9qvtx.csv");
  for (const Unopened& row : k_rows) {
    SCOPED_TRACE(row.code);
    kit::write_file(place.in_table("D4WVTX.IDX"), row.index);
    kit::write_file(place.in_table("D4WVTX.BIN"), row.data);
    expect_failure(run_quick({"-r9q", place.table()}), init_message(row.code),
                   k_init_line);
  }
  EXPECT_EQ(read("r9qvtx.csv"), k_old);
  EXPECT_TRUE(place.temporaries().empty());
}

TEST_F(vtx2csv_e2e, a_directory_can_look_like_an_option) {
  expect_failure(run_quick({"-r9q", "-?"}), init_message(1), k_init_line);
}

TEST_F(vtx2csv_e2e, an_index_of_no_entries_is_an_assertion) {
  kit::write_file(place.in_table("D4WVTX.IDX"), table_bytes::index_head(0));
  expect_assertion(run_quick({"-r9q", place.table()}), "r9qvtxdb", "");
}

TEST_F(vtx2csv_e2e, a_fatal_row_leaves_the_old_output_and_the_temporary_file) {
  place.make_table({security(1), security(2).day(5, -1)});
  write_old("out.csv");
  expect_assertion(run_quick({"-r9q", place.table(), "out.csv"}), "zxdate",
                   "start converting to out.csv");
  EXPECT_EQ(read("out.csv"), k_old);
  EXPECT_EQ(place.temporaries().size(), 1U);
  // Beside the output stands the stack dump.
  EXPECT_EQ(std::distance(fs::directory_iterator(place.work()), {}), 2);
}

TEST_F(vtx2csv_e2e, an_output_that_cannot_be_deleted_stays) {
  write_old("out.csv");
  fs::permissions(place.in_work("out.csv"), fs::perms::owner_read);
  expect_failure(run_quick({"-r9q", place.table(), "out.csv"}),
                 "1027: delefile: cant del 'out.csv'",
                 "[1027-1027-0/E-0/E/out.csv/]", "start converting to out.csv");
  EXPECT_EQ(read("out.csv"), k_old);
  EXPECT_EQ(place.temporaries().size(), 1U);
}

TEST_F(vtx2csv_e2e, a_folder_is_never_replaced) {
  fs::create_directory(place.in_work("out.csv"));
  const ProcessResult result = run_quick({"-r9q", place.table(), "out.csv"});
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_EQ(normal_screen(result.out),
            "start converting to out.csv" +
                failure_screen(k_quick_tool, "1000: bailed out: zxsys2:288 ",
                               "[1000-1000-0/E-0/E/zxsys2:288/]"));
  EXPECT_TRUE(fs::is_directory(place.in_work("out.csv")));
  EXPECT_EQ(place.temporaries().size(), 1U);
}

// Only a file that is not there may be missing, not its folder.
TEST_F(vtx2csv_e2e, an_output_without_its_folder_is_fatal_when_it_is_replaced) {
  expect_failure(run_quick({"-r9q", place.table(), "none\\out.csv"}),
                 "1027: delefile: cant del 'none\\out.csv'",
                 "[1027-1027-0/E-0/E/none\\out.csv/]",
                 "start converting to none\\out.csv");
  // What was made of the table is whole.
  const std::vector<std::string> left = place.temporaries();
  ASSERT_EQ(left.size(), 1U);
  EXPECT_EQ(kit::read_file((fs::path(place.temp()) / left[0]).string()),
            small_csv());
}

TEST_F(vtx2csv_e2e, without_a_temporary_folder_no_name_is_free) {
  write_old("r9qvtx.csv");
  fs::remove(place.temp());
  const ProcessResult result = run_quick({"-r9q", place.table()});
  fs::create_directory(place.temp());
  EXPECT_EQ(result.exit_code, 100);
  EXPECT_TRUE(result.out.starts_with(
      "start converting to r9qvtx.csv\r\n" + kit::built_program(k_quick_tool) +
      " 1.01a Fatal Error 1037: uniqfile: failed to "
      "find on '"))
      << result.out;
  EXPECT_EQ(read("r9qvtx.csv"), k_old);
}

}  // namespace
