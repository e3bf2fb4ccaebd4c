// zxusage_test.cpp - command-line options: declarations, the scan of the
// arguments and its ends as tables; the usage screen and the way out as
// processes.
// Tests zxlib/zxusage.h and zxusage.cpp.
#include "zxusage.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/cases.h"
#include "kit/text.h"
#include "zxmainf.h"
#include "zxplat.h"
#include "zxsfmt.h"

namespace {

using Words = std::vector<std::string>;
using Options = std::map<std::string, std::string>;

using kit::text_of;

zxStr string_of(const std::string& text) {
  return zxStr(std::string_view(text));
}

// What a parse gives: its result, the options, and the arguments left.
struct Parsed {
  std::string result;
  Options options;
  Words left;

  friend bool operator==(const Parsed&, const Parsed&) = default;
};

std::ostream& operator<<(std::ostream& out, const Parsed& parsed) {
  out << "'" << parsed.result << "' {";
  for (const auto& [name, parameter] : parsed.options)
    out << name << "='" << parameter << "' ";
  out << "} [";
  for (const std::string& word : parsed.left) out << "'" << word << "' ";
  return out << "]";
}

// The options that are in the table, of those that the row names.
Options options_in(const zxSA<zxStr>& table, const Options& expected) {
  Options found;
  for (const auto& [name, parameter] : expected) {
    if (const zxStr* value = table.find(string_of(name)))
      found[name] = text_of(*value);
  }
  const auto extra = static_cast<std::size_t>(table.length());
  if (extra != found.size())
    found["(entries)"] = std::to_string(table.length());
  return found;
}

Words words_in(const zxQVA<zxStr>& array) {
  Words words;
  for (std::int32_t i = 0; i < array.length(); ++i)
    words.push_back(text_of(array.get(i)));
  return words;
}

Parsed parse(const std::string& declaration, const Words& arguments,
             const Options& expected) {
  zxQVA<zxStr> args;
  zxSA<zxStr> opts;
  for (const std::string& word : arguments) args.append(string_of(word));
  const zxStr result = parse_opts(string_of(declaration), args, opts);
  return {text_of(result), options_in(opts, expected), words_in(args)};
}

struct Row {
  const char* declaration;
  Words arguments;
  Parsed expected;
};

void expect_rows(const std::vector<Row>& rows) {
  for (const Row& row : rows) {
    std::string trace = row.declaration + std::string(" <-");
    for (const std::string& word : row.arguments) trace += " '" + word + "'";
    SCOPED_TRACE(trace);
    EXPECT_EQ(parse(row.declaration, row.arguments, row.expected.options),
              row.expected);
  }
}

constexpr char k_tool[] = "-?; -r9q :s";

// ---- the export tool's own declaration

TEST(zxusage, the_export_tools_command_lines) {
  expect_rows({
      {k_tool, {}, {"", {}, {}}},
      {k_tool, {"-?"}, {"", {{"-?", ""}}, {}}},
      {k_tool, {"-?+"}, {"", {{"-?", "+"}}, {}}},
      {k_tool, {"-?-"}, {"", {{"-?", "-"}}, {}}},
      {k_tool, {"-r9q", "dir"}, {"", {{"-r9q", "dir"}}, {}}},
      {k_tool, {"-r9q", "dir", "out"}, {"", {{"-r9q", "dir"}}, {"out"}}},
      {k_tool, {"out"}, {"", {}, {"out"}}},
      {k_tool, {"out", "-r9q", "dir"}, {"", {}, {"out", "-r9q", "dir"}}},
      {k_tool, {"-r9q"}, {"bad or missing parm for -r9q", {}, {}}},
      {k_tool, {"-r9q", ""}, {"bad or missing parm for -r9q", {}, {""}}},
      {k_tool, {"-r9q", "-?"}, {"", {{"-r9q", "-?"}}, {}}},
      {k_tool, {"-?", "-r9q", "d"}, {"", {{"-?", ""}, {"-r9q", "d"}}, {}}},
      {k_tool, {"-x"}, {"bad option: -x", {}, {"-x"}}},
      {k_tool, {"-r9"}, {"bad option: -r9", {}, {"-r9"}}},
      {k_tool, {"-r9qdir"}, {"bad option: -r9qdir", {}, {"-r9qdir"}}},
      {k_tool, {"-R9Q", "d"}, {"bad option: -R9Q", {}, {"-R9Q", "d"}}},
      {k_tool, {"-?x"}, {"bad option: -x", {{"-?", ""}}, {"-x"}}},
      {k_tool, {"-??"}, {"", {{"-?", ""}}, {}}},
      {k_tool, {"-?r9q", "d"}, {"", {{"-?", ""}, {"-r9q", "d"}}, {}}},
      {k_tool, {"-?+-"}, {"bad option: -+-", {{"-?", ""}}, {"-+-"}}},
  });
}

// ---- declarations

TEST(zxusage, entries_and_words_may_be_separated_in_many_ways) {
  expect_rows({
      {"", {"-a"}, {"bad option: -a", {}, {"-a"}}},
      {"-a,-b;-c",
       {"-a", "-b", "-c"},
       {"", {{"-a", ""}, {"-b", ""}, {"-c", ""}}, {}}},
      {";,;-a,,;;-b,", {"-a", "-b"}, {"", {{"-a", ""}, {"-b", ""}}, {}}},
      {" -a \t:s\r\n, -b\v\f",
       {"-a", "x", "-b"},
       {"", {{"-a", "x"}, {"-b", ""}}, {}}},
      {"-a :s -b :s", {"-b", "x"}, {"", {{"-a", "x"}}, {}}},
  });
}

TEST(zxusage, flags_are_the_default_and_texts_are_declared) {
  expect_rows({
      {"-a", {"-a", "x"}, {"", {{"-a", ""}}, {"x"}}},
      {"-a :b", {"-a", "x"}, {"", {{"-a", ""}}, {"x"}}},
      {"-a :s", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
  });
}

TEST(zxusage, a_type_word_is_found_by_its_colon_and_letter) {
  expect_rows({
      {"-a :stop", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
      {"-a word:s", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
      {"-a :b+", {"-a", "x"}, {"", {{"-a", ""}}, {"x"}}},
      {"-a 1:2:s3", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
  });
}

TEST(zxusage, the_last_type_word_and_in_a_word_the_first_letter_decide) {
  expect_rows({
      {"-a :s :b", {"-a", "x"}, {"", {{"-a", ""}}, {"x"}}},
      {"-a :b :s", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
      {"-a :s:b", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
      {"-a :b:s", {"-a", "x"}, {"", {{"-a", ""}}, {"x"}}},
  });
}

TEST(zxusage, other_words_are_spellings_of_the_first) {
  expect_rows({
      {"-l --long list", {"--long"}, {"", {{"-l", ""}}, {}}},
      {"-l --long list", {"list"}, {"", {{"-l", ""}}, {}}},
      {"-l --long list", {"-l"}, {"", {{"-l", ""}}, {}}},
      {"-l :s --long", {"--long", "x"}, {"", {{"-l", "x"}}, {}}},
      {"-l --long :s -m", {"-m", "x"}, {"", {{"-l", "x"}}, {}}},
      {"-l -m :s", {"-mx"}, {"", {{"-l", "x"}}, {}}},
      {"--long -l", {"-l-"}, {"", {{"--long", "-"}}, {}}},
      {"-l :s --long", {"--long"}, {"bad or missing parm for --long", {}, {}}},
      {"list", {"list", "x"}, {"", {{"list", ""}}, {"x"}}},
  });
}

TEST(zxusage, the_first_word_is_the_name_as_it_is_typed) {
  expect_rows({
      {"-a:s", {"-a:s", "x"}, {"", {{"-a:s", ""}}, {"x"}}},
      {":s", {":s"}, {"", {{":s", ""}}, {}}},
  });
}

TEST(zxusage, a_later_entry_wins_a_spelling) {
  expect_rows({
      {"-a :s; -b -a", {"-a", "x"}, {"", {{"-b", ""}}, {"x"}}},
      {"-b -a; -a :s", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
      {"-a; -a :s", {"-a", "x"}, {"", {{"-a", "x"}}, {}}},
      // An alias leads to the name, whose type is the later one.
      {"-a --all :s; -a", {"--all", "x"}, {"", {{"-a", ""}}, {"x"}}},
      {"-a --all; -a :s", {"--all", "x"}, {"", {{"-a", "x"}}, {}}},
  });
}

// ---- options spelled in full

TEST(zxusage, a_flag_spelled_in_full_never_takes_the_next_argument) {
  expect_rows({
      {"-a", {"-a", "+"}, {"", {{"-a", ""}}, {"+"}}},
      {"-a", {"-a", "-"}, {"", {{"-a", ""}}, {"-"}}},
      {"-a", {"-a", ""}, {"", {{"-a", ""}}, {""}}},
  });
}

TEST(zxusage, a_text_takes_the_next_argument_whatever_it_is) {
  expect_rows({
      {"-a :s; -b", {"-a", "-b"}, {"", {{"-a", "-b"}}, {}}},
      {"-a :s", {"-a", "-"}, {"", {{"-a", "-"}}, {}}},
      {"-a :s", {"-a", "--"}, {"", {{"-a", "--"}}, {}}},
      {"-a :s", {"-a", "-a"}, {"", {{"-a", "-a"}}, {}}},
      {"-a :s", {"-a", " "}, {"", {{"-a", " "}}, {}}},
      {"-a :s", {"-a", "two words", "c"}, {"", {{"-a", "two words"}}, {"c"}}},
      {"-a :s", {"-a"}, {"bad or missing parm for -a", {}, {}}},
      {"-a :s", {"-a", "", "b"}, {"bad or missing parm for -a", {}, {"", "b"}}},
  });
}

TEST(zxusage, names_are_compared_exactly) {
  expect_rows({
      {"-a", {"-A"}, {"bad option: -A", {}, {"-A"}}},
      {"--all", {"--al"}, {"bad option: --al", {}, {"--al"}}},
      {"--all", {"--alls"}, {"bad option: --alls", {}, {"--alls"}}},
  });
}

// ---- options with something attached

TEST(zxusage, a_parameter_may_be_attached) {
  expect_rows({
      {"-f :s", {"-fname"}, {"", {{"-f", "name"}}, {}}},
      {"-f :s", {"-fname", "x"}, {"", {{"-f", "name"}}, {"x"}}},
      {"-f :s", {"-f-"}, {"", {{"-f", "-"}}, {}}},
      {"-f :s", {"-f-f"}, {"", {{"-f", "-f"}}, {}}},
      {"-f :s", {"-f "}, {"", {{"-f", " "}}, {}}},
      {"-f", {"-f+"}, {"", {{"-f", "+"}}, {}}},
      {"-f", {"-f-"}, {"", {{"-f", "-"}}, {}}},
      {"-? :s", {"-?x"}, {"", {{"-?", "x"}}, {}}},
      {"-- :s", {"--x"}, {"", {{"--", "x"}}, {}}},
  });
}

TEST(zxusage, flags_may_stand_in_a_cluster) {
  expect_rows({
      {"-a;-b;-c", {"-abc"}, {"", {{"-a", ""}, {"-b", ""}, {"-c", ""}}, {}}},
      {"-a;-b", {"-ab-"}, {"", {{"-a", ""}, {"-b", "-"}}, {}}},
      {"-a;-b", {"-ab+", "x"}, {"", {{"-a", ""}, {"-b", "+"}}, {"x"}}},
      {"-a", {"-aa"}, {"", {{"-a", ""}}, {}}},
      {"-a", {"-abc"}, {"bad option: -bc", {{"-a", ""}}, {"-bc"}}},
      {"-a;-b",
       {"-abx", "y"},
       {"bad option: -x", {{"-a", ""}, {"-b", ""}}, {"-x", "y"}}},
      {"-a;-b", {"-a-b"}, {"bad option: --b", {{"-a", ""}}, {"--b"}}},
      {"-a;-b", {"-a+b"}, {"bad option: -+b", {{"-a", ""}}, {"-+b"}}},
      {"-a", {"-a--"}, {"bad option: ---", {{"-a", ""}}, {"---"}}},
      {"-a", {"-a?"}, {" ", {{"-a", ""}}, {"-?"}}},
  });
}

TEST(zxusage, a_cluster_may_end_in_an_option_with_a_parameter) {
  expect_rows({
      {"-a;-f :s", {"-afname"}, {"", {{"-a", ""}, {"-f", "name"}}, {}}},
      {"-a;-f :s", {"-af", "name"}, {"", {{"-a", ""}, {"-f", "name"}}, {}}},
      {"-a;-f :s", {"-af"}, {"bad or missing parm for -f", {{"-a", ""}}, {}}},
      {"-a;-r9q :s", {"-ar9q", "x"}, {"", {{"-a", ""}, {"-r9q", "x"}}, {}}},
  });
}

TEST(zxusage, the_last_of_a_repeated_option_counts) {
  expect_rows({
      {"-a", {"-a-", "-a"}, {"", {{"-a", ""}}, {}}},
      {"-a", {"-a", "-a-", "-a+"}, {"", {{"-a", "+"}}, {}}},
      {"-f :s", {"-fx", "-f", "y"}, {"", {{"-f", "y"}}, {}}},
      {"-f --file :s", {"--file", "y", "-fx"}, {"", {{"-f", "x"}}, {}}},
  });
}

TEST(zxusage, options_that_are_there_already_stay) {
  zxQVA<zxStr> args;
  zxSA<zxStr> opts;
  opts.set("-a", "old");
  opts.set("-b", "old");
  args.append("-a");
  EXPECT_TRUE(parse_opts("-a", args, opts).is_empty());
  EXPECT_EQ(text_of(opts.get("-a")), "");
  EXPECT_EQ(text_of(opts.get("-b")), "old");
  EXPECT_EQ(opts.length(), 2);
}

TEST(zxusage, an_option_behind_a_bad_one_is_not_looked_at) {
  expect_rows({
      {"-a;-b",
       {"-a", "-x", "-b"},
       {"bad option: -x", {{"-a", ""}}, {"-x", "-b"}}},
      {"-a;-f :s",
       {"-f", "", "-a"},
       {"bad or missing parm for -f", {}, {"", "-a"}}},
  });
}

// ---- where the scan ends

TEST(zxusage, a_question_that_is_not_declared_is_a_blank) {
  expect_rows({
      {"", {"-?"}, {" ", {}, {"-?"}}},
      {"-a", {"-a", "-?", "x"}, {" ", {{"-a", ""}}, {"-?", "x"}}},
      {"-a", {"-?x"}, {"bad option: -?x", {}, {"-?x"}}},
      {"-a", {"x", "-?"}, {"", {}, {"x", "-?"}}},
  });
}

TEST(zxusage, a_dash_goes_if_another_follows_and_stays_otherwise) {
  expect_rows({
      {"-x", {"-", "-x"}, {"", {}, {"-x"}}},
      {"-x", {"-", "x"}, {"", {}, {"-", "x"}}},
      {"-x", {"-"}, {"", {}, {"-"}}},
      {"-x", {"-", ""}, {"", {}, {"-", ""}}},
      {"-x", {"-", "-"}, {"", {}, {"-"}}},
      {"-x", {"-", "-file", "-"}, {"", {}, {"-file", "-"}}},
      {"-x", {"--", "-x"}, {"", {}, {"-x"}}},
      {"-x", {"--", "x"}, {"", {}, {"--", "x"}}},
      {"-x", {"--"}, {"", {}, {"--"}}},
      {"-x", {"--", "--", "x"}, {"", {}, {"--", "x"}}},
      {"-x", {"--", "-?"}, {"", {}, {"-?"}}},
      {"-x", {"-x", "-", "-y"}, {"", {{"-x", ""}}, {"-y"}}},
      {"-x", {"---"}, {"bad option: ---", {}, {"---"}}},
      {"-x", {"--x"}, {"bad option: --x", {}, {"--x"}}},
      {"-x; --", {"--", "-x"}, {"", {{"-x", ""}, {"--", ""}}, {}}},
  });
}

TEST(zxusage, the_first_positional_argument_ends_the_options) {
  expect_rows({
      {"-x", {"a", "-x", "-y", "-?"}, {"", {}, {"a", "-x", "-y", "-?"}}},
      {"-x", {"-x", "a", "b"}, {"", {{"-x", ""}}, {"a", "b"}}},
      {"-x", {"", "-x"}, {"", {}, {"", "-x"}}},
      {"-x", {" -x"}, {"", {}, {" -x"}}},
      {"-x", {"+x"}, {"", {}, {"+x"}}},
      {"-x", {"x-"}, {"", {}, {"x-"}}},
  });
}

TEST(zxusage, an_empty_command_line_is_good) {
  expect_rows({{"-x", {}, {"", {}, {}}}, {"", {}, {"", {}, {}}}});
}

// ---- asking

TEST(zxusage, an_option_is_on_unless_it_is_missing_or_a_minus) {
  const struct {
    const char* parameter;
    bool on;
  } rows[] = {{"", true},   {"+", true},   {"-", false},
              {"--", true}, {"off", true}, {"- ", true}};
  EXPECT_FALSE(opt_on("-x"));
  for (const auto& row : rows) {
    g_opts.set("-x", row.parameter);
    EXPECT_EQ(opt_on("-x"), row.on) << row.parameter;
    EXPECT_FALSE(opt_on("-X"));
    EXPECT_FALSE(opt_on("x"));
    EXPECT_FALSE(opt_on(""));
  }
  g_opts.clear();
  EXPECT_FALSE(opt_on("-x"));
}

TEST(zxusage, reading_an_option_that_is_missing_gives_the_empty_text) {
  EXPECT_TRUE(g_opts.get("-never").is_empty());
}

// ---- the usage screen

// Starts as the program "C:\tools\demo.exe" of version 2.0; the arguments of
// the case are the program's own.
void start_demo(int argc, char** argv) {
  std::vector<const char*> arguments(argv, argv + argc);
  arguments[0] = "C:\\tools\\demo.exe";
  usage_text = "[-?] file\n\nline\r\n\rend";
  program_version_text = "2.0";
  init_zxlib_args(argc, arguments.data());
}

void say_in_exit_handler() {
  constexpr std::string_view k_text = "handler ran";
  zxplat::files.write(zxplat::k_stdout_fd, k_text.data(), k_text.size());
}

ZX_CASE(zxusage_shows_message) {
  start_demo(argc, argv);
  std::atexit(say_in_exit_handler);
  oprint("before ");
  show_usage(g_args.get_or(0));
  oprint("never reached");
  return 5;
}

constexpr char k_screen[] =
    "Usage: DEMO 2.0 [-?] file\r\n\r\nline\r\nend\r\n"
    "zx 3.64b test w32  vc\n";

TEST(zxusage, the_screen_goes_to_standard_error_and_ends_the_process) {
  const struct {
    const char* message;
    const char* ahead;
  } rows[] = {
      {"", ""},
      {" ", ""},
      {"bad option: -x", "Error: bad option: -x\r\n"},
      {"  ", "Error:   \r\n"},
      {"100% #1 $", "Error: 100% #1 $\r\n"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.message);
    const auto result = kit::run_case("zxusage_shows_message", {row.message});
    EXPECT_EQ(result.exit_code, 1);
    EXPECT_EQ(result.err, row.ahead + std::string(k_screen));
    EXPECT_EQ(result.out, "handler ranbefore ");
  }
}

ZX_CASE(zxusage_without_texts) {
  usage_text = nullptr;
  program_version_text = "";
  const char* arguments[] = {"tool"};
  init_zxlib_args(1, arguments);
  show_usage("");
  return 5;
}

TEST(zxusage, a_program_without_usage_and_version_says_so) {
  const auto result = kit::run_case("zxusage_without_texts");
  EXPECT_EQ(result.exit_code, 1);
  EXPECT_EQ(result.err, "Usage: TOOL no usage info\r\nzx 3.64b test w32  vc\n");
  EXPECT_EQ(result.out, "");
}

// A program as the header's example has it.
ZX_CASE(zxusage_program) {
  start_demo(argc, argv);
  init_opts("-?; -r9q :s");
  if (opt_on("-?")) show_usage("");
  oprint("#|#|#", g_opts.get("-r9q"), g_args.length(), positional_arg(0));
  return 0;
}

TEST(zxusage, a_program_gets_its_options_and_arguments) {
  const struct {
    Words arguments;
    const char* out;
  } rows[] = {
      {{}, "|0|"},
      {{"-r9q", "a b", "x*", "y"}, "a b|2|x*"},
      {{"-?-", "-"}, "|1|-"},
      {{"--", "-x"}, "|1|-x"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.out);
    const auto result = kit::run_case("zxusage_program", row.arguments);
    EXPECT_EQ(result.exit_code, 0);
    EXPECT_EQ(result.out, row.out);
    EXPECT_EQ(result.err, "");
  }
}

TEST(zxusage, a_bad_command_line_ends_with_the_screen) {
  const struct {
    Words arguments;
    const char* ahead;
  } rows[] = {
      {{"-?"}, ""},
      {{"-r9q"}, "Error: bad or missing parm for -r9q\r\n"},
      {{"-x"}, "Error: bad option: -x\r\n"},
      {{"-?x"}, "Error: bad option: -x\r\n"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.ahead);
    const auto result = kit::run_case("zxusage_program", row.arguments);
    EXPECT_EQ(result.exit_code, 1);
    EXPECT_EQ(result.err, row.ahead + std::string(k_screen));
    EXPECT_EQ(result.out, "");
  }
}

ZX_CASE(zxusage_undeclared_question) {
  start_demo(argc, argv);
  init_opts("-a");
  return 0;
}

TEST(zxusage, an_undeclared_question_shows_the_screen_without_an_error) {
  const auto result = kit::run_case("zxusage_undeclared_question", {"-?"});
  EXPECT_EQ(result.exit_code, 1);
  EXPECT_EQ(result.err, k_screen);
}

TEST(zxusage, the_export_tool_shows_its_usage) {
  const std::string tool = kit::built_program("vtx2csv");
  if (tool.empty()) GTEST_SKIP() << "ZX_BIN_DIR does not name the programs";
  const auto result = kit::run_process({tool, "-?"});
  EXPECT_EQ(result.exit_code, 1);
  EXPECT_EQ(result.out, "");
  const std::string head =
      "Usage: VTX2CSV 1.01a [-?] [-r9q directory] [csv-file]\r\n"
      "\r\n"
      "Converts r9qvtx.bin file to csv format\r\n"
      "-r9q - the directory where r9qhist.dat is at. default = use current "
      "dir.\r\n"
      "-? - display this help screen\r\n"
      "\r\n"
      "Program info: ";
  EXPECT_EQ(result.err.substr(0, head.size()), head);
  const std::string tail = "\r\nzx 3.64b test w32  vc\n";
  ASSERT_GE(result.err.size(), head.size() + tail.size());
  EXPECT_EQ(result.err.substr(result.err.size() - tail.size()), tail);
  // Where it was compiled from and when: one line of the compiler's own.
  const std::string info = result.err.substr(
      head.size(), result.err.size() - head.size() - tail.size());
  EXPECT_NE(info.find(" Compiled: "), info.npos) << info;
  EXPECT_EQ(info.find_first_of("\r\n"), info.npos) << info;
}

}  // namespace
