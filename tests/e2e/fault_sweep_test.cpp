// fault_sweep_test.cpp - an export of which every system call fails in turn:
// obautil/vtx2csv with zxlib's files below it, through vtx2csv_faults
// (fault_main.cpp).
//
// A script tells for each kind of call what its failures end in, in the order
// of the calls: a message, or success where another road is left, and what
// has become of an output file that stood there before.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "e2e/tool_run.h"
#include "kit/failure.h"
#include "kit/faults.h"
#include "zxsys2.h"

namespace {

namespace fs = std::filesystem;

using kit::Call;
using kit::Faults;
using kit::ProcessResult;
using namespace tool_run;

constexpr char k_old_content[] = "the file of yesterday";

// ---- what is expected

// What has become of the old output.
enum class Output {
  old,   // untouched
  gone,  // deleted, its successor whole under another name
  made,  // replaced by its successor
};

// The end of one or more runs of which consecutive calls failed.
struct Step {
  std::string message;  // empty for success
  Output output = Output::old;
  bool screen_is_lost = false;  // the call was to write on the screen
};

// The steps in the order of the calls that failed.
using Script = std::vector<Step>;

// By the names of the calls; those without a script must not occur.
using Scripts = std::map<std::string, Script>;

// How one run ended.
struct Ending {
  std::string message;
  Output output = Output::old;
};

bool agree(const Step& step, const Ending& ending) {
  return step.message == ending.message && step.output == ending.output;
}

// Goes through a script with the endings of runs.
class Follower {
 public:
  explicit Follower(const Script& wanted) : script(wanted) {}

  // The step that an ending belongs to: that of the one before it, or the
  // next; null if it is neither.
  const Step* step_of(const Ending& ending) {
    if (at > 0 && agree(script[at - 1], ending)) return &script[at - 1];
    if (at == script.size() || !agree(script[at], ending)) return nullptr;
    return &script[at++];
  }

  // True if no step is missing.
  bool is_done() const { return at == script.size(); }

  std::string next() const {
    return at == script.size()          ? "nothing more"
           : script[at].message.empty() ? "success"
                                        : "'" + script[at].message + "'";
  }

 private:
  const Script& script;
  std::size_t at = 0;
};

// A text with the numbers of temporary names replaced by N.
std::string without_numbers(std::string text) {
  for (std::size_t at = 0; (at = text.find("tmp", at)) != text.npos;) {
    at += 3;
    std::size_t end = at;
    while (end < text.size() && text[end] >= '0' && text[end] <= '9') ++end;
    if (end > at && end < text.size() && text[end] == '.')
      text.replace(at, end - at, "N");
  }
  return text;
}

std::string content_of(const std::string& path) {
  return fs::exists(path) ? kit::read_file(path) : "missing";
}

// ---- the table

// Enough for several blocks of every file, and in an order that makes the
// reading jump.
constexpr int k_records = 600;
constexpr int k_block = 200;

int slot_of(int record) {
  const int blocks = k_records / k_block;
  return (record / k_block * 2 % blocks) * k_block + record % k_block;
}

void make_large_table(const Place& place) {
  std::vector<table_bytes::Entry> entries;
  std::vector<table_bytes::Record> records(k_records);
  for (int i = 0; i < k_records; ++i) {
    const int slot = slot_of(i);
    entries.push_back({"NAME", i, table_bytes::offset_of(slot)});
    records[static_cast<std::size_t>(slot)] =
        table_bytes::security(i, "name" + std::string(60, 'x'));
  }
  place.make_table(entries, records);
}

std::string large_csv() {
  std::string csv = csv_header();
  for (int i = 0; i < k_records; ++i)
    csv += csv_line(i, "name" + std::string(60, 'x'));
  return csv;
}

// ---- the sweep

// The backslash form in which the library shows names of its own making.
std::string in_library_form(std::string path) {
  std::replace(path.begin(), path.end(), '/', '\\');
  return path;
}

class fault_sweep : public testing::Test {
 protected:
  void SetUp() override {
    if (!has_programs()) GTEST_SKIP() << k_no_programs;
    make_large_table(place);
    data = kit::read_file(place.in_table("D4WVTX.BIN"));
  }

  // Both files under their second names as well.
  void add_second_choices() const {
    for (const std::string end : {"VTX.IDX", "VTX.BIN"})
      fs::copy_file(place.in_table("D4W" + end), place.in_table("R9Q" + end));
  }

  ProcessResult run(const std::string& output, const std::string& wish,
                    const std::string& counts = "") const {
    kit::ProcessOptions options = place.options();
    if (!wish.empty()) options.variables.emplace_back("ZX_FAIL", wish);
    if (!counts.empty())
      options.variables.emplace_back("ZX_FAIL_COUNTS", counts);
    return place.run(k_quick_tool, {"-r9q", place.table(), output}, options);
  }

  // Runs without a fault; the number of calls of each kind.
  std::map<std::string, int> count_calls(const std::string& output) const {
    const std::string file = place.in_work("counts.txt");
    const ProcessResult result = run(output, "", file);
    EXPECT_EQ(result.exit_code, 0);
    EXPECT_EQ(result.out, told(output));
    std::map<std::string, int> counts;
    std::ifstream in(file);
    std::string name;
    int count = 0;
    while (in >> name >> count) counts[name] = count;
    EXPECT_EQ(counts.size(), zx_size(kit::k_calls));
    return counts;
  }

  // What was printed as the message of a failure; empty on success.
  static std::string message_of(const ProcessResult& result) {
    constexpr std::string_view k_before = " Fatal Error ";
    const std::string screen = normal_screen(result.out);
    const std::size_t start = screen.find(k_before);
    const std::size_t end = screen.rfind(" [");
    if (start == screen.npos || end == screen.npos) return "";
    const std::size_t from = start + k_before.size();
    return without_numbers(screen.substr(from, end - from));
  }

  Output output_of(const std::string& path) const {
    const std::string content = content_of(path);
    if (content == k_old_content) return Output::old;
    if (content == csv) return Output::made;
    EXPECT_FALSE(fs::exists(path)) << "part of a file: " << content.size();
    // The only copy of what was made must not be lost.
    const std::vector<std::string> left = place.temporaries();
    EXPECT_TRUE(left.size() == 1 &&
                content_of((fs::path(place.temp()) / left[0]).string()) == csv);
    return Output::gone;
  }

  // The old file is where the tool finds it, and nothing of other runs.
  void lay_out(const std::string& path) const {
    place.clear_temporaries();
    kit::write_file(path, k_old_content);
  }

  void expect_ending(const ProcessResult& result, const Step& step,
                     const std::string& output) const {
    EXPECT_FALSE(result.timed_out);
    EXPECT_EQ(result.exit_code, step.message.empty() ? 0 : 100);
    EXPECT_EQ(result.err, "");
    if (step.message.empty()) {
      EXPECT_EQ(result.out, step.screen_is_lost ? "" : told(output));
    } else {
      EXPECT_TRUE(result.out.ends_with("]\r\n")) << result.out;
    }
  }

  // Makes each call of a kind fail, in a run of its own.  `path` is where the
  // output lies as the test finds it.
  void sweep_calls(const std::string& call, int count, const Script& script,
                   const std::string& output, const std::string& path) const {
    Follower follower(script);
    for (int n = 1; n <= count; ++n) {
      SCOPED_TRACE(call + ":" + std::to_string(n) + " of " +
                   std::to_string(count));
      lay_out(path);
      const ProcessResult result = run(output, call + ":" + std::to_string(n));
      const Ending ending = {message_of(result), output_of(path)};
      const Step* step = follower.step_of(ending);
      ASSERT_NE(step, nullptr)
          << "exit code " << result.exit_code << ", '" << result.out
          << "', the output " << static_cast<int>(ending.output)
          << "; could have come: " << follower.next();
      expect_ending(result, *step, output);
    }
    EXPECT_TRUE(follower.is_done())
        << call << ", " << count << " calls, without " << follower.next();
  }

  void sweep(Scripts& scripts, const std::string& output,
             const std::string& path) const {
    for (const auto& [call, count] : count_calls(output))
      sweep_calls(call, count, scripts[call], output, path);
    EXPECT_TRUE(content_of(place.in_table("D4WVTX.BIN")) == data);
  }

  // The names as the messages show them.
  std::string index_name() const { return place.table() + "\\D4WVTX.IDX"; }
  std::string data_name() const { return place.table() + "\\D4WVTX.BIN"; }
  std::string temp_name() const {
    return in_library_form(place.temp()) + "\\tmpN.csv";
  }

  Place place;
  const std::string csv = large_csv();
  std::string data;
};

// The messages that the scripts are made of.
std::string no_reading(const std::string& name) {
  return "1002: open: Can't open file '" + name + "' for reading";
}
std::string no_creating(const std::string& name) {
  return "1004: create: Can't open file '" + name + "' for writing";
}
std::string no_closing(const std::string& name) {
  return "1010: close: '" + name + "' failed";
}
std::string no_read(const std::string& name) {
  return "1014: read: '" + name + "' operation failed";
}
std::string no_write(const std::string& name) {
  return "1016: write: failed on '" + name + "'";
}
std::string no_flush(const std::string& name) {
  return "1020: flush: '" + name + "' operation failed";
}
std::string no_source_deleting(const std::string& name) {
  return "1026: delfile: cant del '" + name + "'";
}
std::string no_target_deleting(const std::string& name) {
  return "1027: delefile: cant del '" + name + "'";
}
std::string no_move(const std::string& from, const std::string& to) {
  return "1036: mvfile: rename fail on '" + from + " to " + to + "'";
}
std::string no_last_rename(const std::string& name) {
  return "1038: cpfile: failed to rename tmp to '" + name + "'";
}
constexpr char k_no_seek[] = "1012: seek: operation failed";
const std::string k_success;

TEST_F(fault_sweep, on_one_device_every_failing_call_is_told) {
  add_second_choices();
  const std::string temp = temp_name();
  Scripts scripts = {
      // A table file that does not open is looked for under its second name.
      {"open", {{k_success, Output::made}, {no_creating(temp)}}},
      {"read", {{no_read(index_name())}, {no_read(data_name())}}},
      {"write",
       {{no_write(temp)}, {no_closing(temp)}, {k_success, Output::made, true}}},
      {"seek", {{k_no_seek}}},
      // The data file goes with the process, behind the last call that can be
      // made to fail.
      {"close", {{no_closing(index_name())}, {no_closing(temp)}}},
      {"rename", {{no_move(temp, "out.csv"), Output::gone}}},
      {"remove", {{no_target_deleting("out.csv")}}},
  };
  sweep(scripts, "out.csv", place.in_work("out.csv"));
}

TEST_F(fault_sweep, across_devices_every_failing_call_is_told) {
  const OtherDevice device("sweep");
  if (!device.exists()) GTEST_SKIP() << "there is no other device";
  add_second_choices();
  const std::string output = device.file("out.csv");
  const std::string temp = temp_name();
  const std::string copy = device.path() + "\\tmpN.cpy";
  Scripts scripts = {
      {"open",
       {{k_success, Output::made},
        {no_creating(temp)},
        {no_reading(temp)},
        {no_creating(copy)}}},
      {"read",
       {{no_read(index_name())}, {no_read(data_name())}, {no_read(temp)}}},
      {"write",
       {{no_write(temp)},
        {no_closing(temp)},
        {no_write(copy)},
        {no_flush(copy)},
        {k_success, Output::made, true}}},
      {"flush", {{no_flush(copy)}}},
      {"seek", {{k_no_seek}}},
      {"close",
       {{no_closing(index_name())}, {no_closing(temp)}, {no_closing(copy)}}},
      {"rename", {{no_last_rename(output), Output::gone}}},
      {"remove",
       {{no_target_deleting(output)},
        {no_source_deleting(temp), Output::made}}},
  };
  sweep(scripts, output, output);
}

TEST_F(fault_sweep, a_rename_that_meets_another_device_is_done_by_copying) {
  const std::string path = place.in_work("out.csv");
  lay_out(path);
  const ProcessResult result = run("out.csv", "rename:1:17");
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, told("out.csv"));
  EXPECT_TRUE(content_of(path) == csv);
  EXPECT_TRUE(place.temporaries().empty());
  EXPECT_EQ(std::distance(fs::directory_iterator(place.work()), {}), 1);
}

TEST_F(fault_sweep, without_second_choices_a_table_does_not_open) {
  const std::string path = place.in_work("out.csv");
  for (const int n : {1, 2}) {
    SCOPED_TRACE(n);
    lay_out(path);
    const ProcessResult result = run("out.csv", "open:" + std::to_string(n));
    EXPECT_EQ(result.exit_code, 100);
    EXPECT_EQ(message_of(result),
              n == 1 ? "ERROR INIT VTX (1)" : "ERROR INIT VTX (5)");
    EXPECT_EQ(content_of(path), k_old_content);
  }
}

// ---- the copying behind a rename, by itself

// A move of a file of several blocks in a folder of its own, the rename of
// which answers that the target is on another device.
class Move {
 public:
  Move() {
    kit::write_file(from(), content);
    kit::write_file(to(), k_old_content);
  }

  std::string from() const { return folder.file("from.csv"); }
  std::string to() const { return folder.file("to.csv"); }

  // Runs it with the n-th call of a kind failing, not counting that rename;
  // 0 for none.  Files that are open when it is left stay so: they belong to
  // a process that ends.
  void run(Call call, int n) {
    faults.fail_nth(Call::rename, 1, zxplat::k_err_other_device);
    failure = kit::failure_of([&] {
      if (n > 0 && call != Call::rename) faults.fail_nth(call, n);
      if (n > 0 && call == Call::rename) faults.fail_all(call, k_other_device);
      move_file(zxStr(std::string_view(from())), zxStr(std::string_view(to())));
    });
  }

  int count(Call call) const { return faults.count(call); }

  // The message with "DIR" for the folder.
  std::string message() const {
    std::string text = failure.message;
    for (std::size_t at; (at = text.find(folder.path())) != text.npos;)
      text.replace(at, folder.path().size(), "DIR");
    return in_library_form(without_numbers(text));
  }

  // One of the two files is whole at any rate.
  Output output() const {
    const std::string at_target = content_of(to());
    if (at_target == content) return Output::made;
    EXPECT_TRUE(content_of(from()) == content);
    if (at_target == k_old_content) return Output::old;
    EXPECT_FALSE(fs::exists(to()));
    return Output::gone;
  }

 private:
  static constexpr int k_other_device = zxplat::k_err_other_device;
  const std::string content = std::string(200'000, 'x') + "end";
  kit::TempDir folder;
  Faults faults;
  kit::Failure failure;
};

// The number of calls of a move without a further fault.
int calls_of_a_move(Call call) {
  Move move;
  move.run(call, 0);
  EXPECT_EQ(move.message(), "");
  EXPECT_EQ(move.output(), Output::made);
  EXPECT_FALSE(fs::exists(move.from()));
  return move.count(call);
}

void sweep_move(Call call, const Script& script) {
  const int count = calls_of_a_move(call) - (call == Call::rename ? 1 : 0);
  Follower follower(script);
  for (int n = 1; n <= count; ++n) {
    SCOPED_TRACE(kit::name_of(call) + (":" + std::to_string(n)));
    Move move;
    move.run(call, n);
    const Ending ending = {move.message(), move.output()};
    ASSERT_NE(follower.step_of(ending), nullptr)
        << "'" << ending.message << "', the output "
        << static_cast<int>(ending.output)
        << "; could have come: " << follower.next();
  }
  EXPECT_TRUE(follower.is_done())
      << count << " calls, without " << follower.next();
}

// The old output was deleted ahead of the rename, so from then on the source
// is what is left.
TEST_F(fault_sweep, every_failing_call_of_the_copying_is_told) {
  constexpr Output k_gone = Output::gone;
  const std::string from = "DIR\\from.csv";
  const std::string to = "DIR\\to.csv";
  const std::string copy = "DIR\\tmpN.cpy";
  sweep_move(Call::open,
             {{no_reading(from), k_gone}, {no_creating(copy), k_gone}});
  sweep_move(Call::read, {{no_read(from), k_gone}});
  sweep_move(Call::write, {{no_write(copy), k_gone}, {no_flush(copy), k_gone}});
  sweep_move(Call::flush, {{no_flush(copy), k_gone}});
  sweep_move(Call::seek, {});
  sweep_move(Call::size, {});
  sweep_move(Call::close,
             {{no_closing(from), k_gone}, {no_closing(copy), k_gone}});
  sweep_move(Call::rename, {{no_last_rename(to), k_gone}});
  sweep_move(Call::remove, {{no_target_deleting(to), Output::old},
                            {no_target_deleting(to), k_gone},
                            {no_source_deleting(from), Output::made}});
}

}  // namespace
