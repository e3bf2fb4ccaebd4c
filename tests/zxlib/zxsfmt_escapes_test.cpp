// zxsfmt_escapes_test.cpp - what formats do without an argument: groups, the
// present moment, columns, references; and environments and lists.
// Tests zxlib/zxsfmt.h and zxsfmt*.cpp.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "format_run.h"
#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "zxmainf.h"
#include "zxsfmt.h"
#include "zxstrm.h"

namespace {

using format_run::bad;
using format_run::compose;
using format_run::compose_in;
using format_run::good;
using format_run::List;
using format_run::list_of;
using format_run::Variable;
using kit::text_of;
using namespace std::string_literals;

// ---- groups

TEST(zxsfmt_escapes, groups_are_those_of_the_last_match) {
  ASSERT_TRUE(match("the key=value; end", "(`w+)=(`w+)"));
  EXPECT_EQ(compose("$0|$1|$2|$3|$9|$`|$'"),
            good("key=value|key|value|||the |; end"));
  EXPECT_EQ(compose("$11"), good("key1"));
  ASSERT_TRUE(match("abcdefghi", "(a)(b)(c)(d)(e)(f)(g)(h)(i)"));
  EXPECT_EQ(compose("$9$8$7$6$5$4$3$2$1"), good("ihgfedcba"));
}

TEST(zxsfmt_escapes, groups_are_added_as_they_are) {
  ASSERT_TRUE(match(zxStr("a\n%d#$1\0", 8), "^.*$"));
  EXPECT_EQ(compose("<$0>\n"), good("<a\n%d#$1\0>\r\n"s));
}

TEST(zxsfmt_escapes, groups_of_a_match_in_the_result_fail_an_assertion) {
  zxStr text = "hello world";
  ASSERT_TRUE(match_buf("w(or)ld", text.begin(), text.end()));
  for (const char* format : {"<$1>", "<$0>", "<$`>", "<$'>"}) {
    EXPECT_ASSERTION(sfmt_to(text, format), "zxsfmt_escape");
    kit::with_failures_dropped(
        [&] { EXPECT_EQ(text_of(sfmt_to(text, format)), "<>"); });
  }
  clear_match();
}

TEST(zxsfmt_escapes, without_a_match_groups_are_empty) {
  flush_regex_cache();
  EXPECT_EQ(compose("<$0$5$`$'>"), good("<>"));
}

// ---- the present moment

TEST(zxsfmt_escapes, the_present_moment_has_three_escapes) {
  const format_run::InZone zone("UTC0");
  const format_run::Clock clock(1'236'434'706);
  EXPECT_EQ(compose("$T"), good("09/03/07 14:05:06"));
  EXPECT_EQ(compose("$d"), good("07-03-09"));
  EXPECT_EQ(compose("$t"), good("14:05:06"));
  EXPECT_EQ(compose("<$M>"), good("<>"));
}

TEST(zxsfmt_escapes, the_present_moment_is_that_of_the_local_clock) {
  const format_run::InZone zone("NPT-5:45");
  const format_run::Clock clock(1'236'434'706);
  EXPECT_EQ(compose("$T $d $t"), good("09/03/07 19:50:06 07-03-09 19:50:06"));
}

// ---- columns

TEST(zxsfmt_escapes, a_cut_leaves_the_first_bytes) {
  EXPECT_EQ(compose("0123456789abc$c10"), good("0123456789"));
  EXPECT_EQ(compose("0123456789$c10"), good("0123456789"));
  EXPECT_EQ(compose("012$c10|"), good("012|"));
  EXPECT_EQ(compose("0123$c1|"), good("0|"));
  EXPECT_EQ(compose("a\nb$c2"), good("a\r"));
  const std::string line(90, 'x');
  EXPECT_EQ(compose((line + "$c").c_str()), good(line.substr(0, 79)));
  EXPECT_EQ(compose((line + "$c0|").c_str()), good(line.substr(0, 79) + "|"));
  EXPECT_EQ(compose((line + "$c000").c_str()), good(line.substr(0, 79)));
  EXPECT_EQ(compose((line + "$c80").c_str()), good(line.substr(0, 80)));
  EXPECT_EQ(compose("abc$c99999999999999999999"), good("abc"));
}

TEST(zxsfmt_escapes, blanks_go_up_to_a_column) {
  EXPECT_EQ(compose("0123456$s|"), good("0123456   |"));
  EXPECT_EQ(compose("0123456789$s|"), good("0123456789          |"));
  EXPECT_EQ(compose("$s|"), good("          |"));
  EXPECT_EQ(compose("$s0|"), good("          |"));
  EXPECT_EQ(compose("012345678$s|"), good("012345678 |"));
  EXPECT_EQ(compose("ab$s5|"), good("ab   |"));
  EXPECT_EQ(compose("abcde$s5|"), good("abcde|"));
  EXPECT_EQ(compose("abcdef$s5|"), good("abcdef|"));
  EXPECT_EQ(compose("a\nb$s5|"), good("a\r\nb |"));
  EXPECT_EQ(compose("$s1000|"), good(std::string(1000, ' ') + "|"));
}

TEST(zxsfmt_escapes, a_text_is_repeated) {
  EXPECT_EQ(compose("$rx3"), good("xxx"));
  EXPECT_EQ(compose("$rab2|"), good("abab|"));
  EXPECT_EQ(compose("$rx0|"), good("|"));
  EXPECT_EQ(compose("$rx00012"), good("xxxxxxxxxxxx"));
  EXPECT_EQ(compose("$r-1-"), good("--"));
  // The first byte is a part of it whatever it is.
  EXPECT_EQ(compose("$r35"), good("33333"));
  EXPECT_EQ(compose("$r3"), bad("$r3"));
  EXPECT_EQ(compose("$r3x2"), good("3x3x"));
  // No byte of it means anything.
  EXPECT_EQ(compose("$r%d#$2"), good("%d#$%d#$"));
  EXPECT_EQ(compose("$r\n2"), good("\n\n"));
  const std::string text(3000, 'y');
  EXPECT_EQ(compose(("$r" + text + "2").c_str()), good(text + text));
}

TEST(zxsfmt_escapes, a_text_to_repeat_has_a_count) {
  for (const char* format : {"a$r", "a$rx", "a$rxyz\n#%%", "a$r$"})
    EXPECT_EQ(compose(format), bad(format)) << format;
}

TEST(zxsfmt_escapes, columns_beyond_all_texts_fail_an_assertion) {
  for (const char* format :
       {"$s2147483648", "$s4294967296", "$s4294967297", "$rabc999999999",
        "$rab1073741824", "$rx2147483648", "$rxy99999999999999999999",
        "ab$rx2147483646"})
    EXPECT_TRUE(
        kit::failure_of([&] { compose(format); }).message.starts_with("1000: "))
        << format;
}

// ---- what is no escape

TEST(zxsfmt_escapes, every_other_byte_is_no_escape) {
  constexpr std::string_view k_escapes = "0123456789`'TdtMcsr%{$";
  for (int byte = 1; byte < 256; ++byte) {
    const char c = static_cast<char>(byte);
    if (k_escapes.find(c) != k_escapes.npos) continue;
    const std::string format = "a$"s + c + "# %d\n";
    EXPECT_EQ(compose(format.c_str(), 1, 2), bad(format)) << byte;
  }
  EXPECT_EQ(compose("a$"), bad("a$"));
  EXPECT_EQ(compose("$path"), bad("$path"));
}

TEST(zxsfmt_escapes, what_was_composed_stays_ahead_of_a_bad_escape) {
  EXPECT_EQ(compose("#$q#", 1, 2), bad("1$q#"));
}

// ---- the program

TEST(zxsfmt_escapes, a_reference_to_the_program_has_no_closing_byte) {
  zxQVA<zxStr> args;
  for (const char* arg : {"-v", "a b", "#%d$1"}) args.append(zxStr(arg));
  const zxStr path = "c:\\bin\\tool.exe";
  const zxStr name = "TOOL";
  const format_run::Program program({&args, &path, &name});
  EXPECT_EQ(compose("$%*|${*|"), good("-v a b #%d$1|-v a b #%d$1|"));
  EXPECT_EQ(compose("$%0|${0|"), good("c:\\bin\\tool.exe|c:\\bin\\tool.exe|"));
  EXPECT_EQ(compose("$%-|${-|"), good("TOOL|TOOL|"));
  EXPECT_EQ(compose("$%1|${2|$%3|"), good("-v|a b|#%d$1|"));
  EXPECT_EQ(compose("<${4$%9>"), good("<>"));
  // The closing byte is not looked at.
  EXPECT_EQ(compose("${*}${0}${-}${1}"),
            good("-v a b #%d$1}c:\\bin\\tool.exe}TOOL}-v}"));
  EXPECT_EQ(compose("$%-%d", 5), good("TOOL5"));
  EXPECT_EQ(compose("$%-%%"), good("TOOL%"));
  EXPECT_EQ(compose("$%-.lif"), good("TOOL.lif"));
  EXPECT_EQ(compose("$%-%--5d|", 5), good("TOOL5    |"));
  EXPECT_EQ(compose("$%12"), good("-v2"));
}

TEST(zxsfmt_escapes, without_a_program_references_to_it_are_empty) {
  const format_run::Program none({nullptr, nullptr, nullptr});
  EXPECT_EQ(compose("<$%*${0$%-${1$%9>"), good("<>"));
}

ZX_CASE(zxsfmt_tells_of_the_program) {
  init_zxlib_args(argc, argv);
  oprint("$%-|$%*|$%1|$%3|\n");
  oprint("#\n", static_cast<int>(sfmt("$%0") == argv[0]));
  return 0;
}

TEST(zxsfmt_escapes, a_program_knows_its_name_and_arguments) {
  const kit::ProcessResult result =
      kit::run_case("zxsfmt_tells_of_the_program", {"one", "t w o"});
  const std::string rest = "|one t w o|one||\r\n1\r\n";
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out.substr(result.out.find('|')), rest);
  EXPECT_NE(result.out.find('|'), 0U);
}

// ---- names

TEST(zxsfmt_escapes, a_name_is_read_from_the_process_environment) {
  const Variable variable("ZX_SFMT_NAME", "#%d$1\n");
  const Variable other("ZX_SFMT_2", "two");
  const Variable none("ZX_SFMT_NONE", nullptr);
  EXPECT_EQ(compose("<${zx_sfmt_name}>"), good("<#%d$1\n>"));
  EXPECT_EQ(compose("<$%zx_sfmt_name%>"), good("<#%d$1\n>"));
  EXPECT_EQ(compose("<${Zx_Sfmt_NAME}>"), good("<#%d$1\n>"));
  EXPECT_EQ(compose("<${zx_sfmt_none}>"), good("<>"));
  EXPECT_EQ(compose("${zx_sfmt_2}${zx_sfmt_2}"), good("twotwo"));
}

// Natively names differ by case, and it is the upper case that is read.
TEST(zxsfmt_escapes, only_the_name_in_upper_case_is_read) {
  if (kit::on_windows()) GTEST_SKIP() << "names do not differ by case here";
  const Variable lower("zx_sfmt_case", "lower");
  EXPECT_EQ(compose("<${zx_sfmt_case}>"), good("<>"));
  const Variable upper("ZX_SFMT_CASE", "upper");
  EXPECT_EQ(compose("<${zx_sfmt_case}>"), good("<upper>"));
}

TEST(zxsfmt_escapes, a_name_ends_with_its_closing_byte_or_ahead_of_another) {
  const Variable variable("ZX_SFMT_X", "x");
  EXPECT_EQ(compose("${zx_sfmt_x}a"), good("xa"));
  EXPECT_EQ(compose("$%zx_sfmt_x%a"), good("xa"));
  EXPECT_EQ(compose("${zx_sfmt_x"), good("x"));
  EXPECT_EQ(compose("$%zx_sfmt_x"), good("x"));
  EXPECT_EQ(compose("${zx_sfmt_x-a}"), good("x-a}"));
  EXPECT_EQ(compose("${zx_sfmt_x}}"), good("x}"));
  EXPECT_EQ(compose("${zx_sfmt_x%d", 1), good("x1"));
  EXPECT_EQ(compose("$%zx_sfmt_x}"), good("x}"));
  EXPECT_EQ(compose("$%zx_sfmt_x%d"), good("xd"));
  EXPECT_EQ(compose("${zx_sfmt_x#", 1), good("x1"));
  EXPECT_EQ(compose("${zx_sfmt_x\xE0"), good("x\xE0"));
  EXPECT_EQ(compose("<${}|$%%|${|${", 1), bad("<|||"));
  EXPECT_EQ(compose("<${}|$%%|${"), good("<||"));
}

TEST(zxsfmt_escapes, a_name_has_any_length) {
  const std::string name(5000, 'n');
  EXPECT_EQ(compose(("<${" + name + "}>").c_str()), good("<>"));
}

// ---- tables

TEST(zxsfmt_escapes, a_table_argument_ahead_of_an_escape_is_the_environment) {
  zxSA<zxStr> table;
  table.ref("name") = "entry";
  table.ref("NAME") = "other";
  table.ref("") = "nameless";
  const Variable variable("NAME", "variable");
  EXPECT_EQ(compose("<${name}>", table), good("<entry>"));
  EXPECT_EQ(compose("<$%NAME%>", table), good("<other>"));
  EXPECT_EQ(compose("<${Name}>", table), good("<>"));
  EXPECT_EQ(compose("<${}>", table), good("<nameless>"));
  EXPECT_EQ(compose("<${name}>"), good("<variable>"));
  EXPECT_EQ(compose("#${name}#", 1, table, 2), good("1entry2"));
  EXPECT_EQ(compose("$M${name}", table), good("entry"));
  EXPECT_EQ(compose("$1${name}|", table).good, true);
}

TEST(zxsfmt_escapes, only_an_escape_takes_a_table) {
  zxSA<zxStr> table;
  EXPECT_EQ(compose("$$", table), bad("$"));
  EXPECT_EQ(compose("a", table), bad("a"));
  EXPECT_EQ(compose("%s", table), bad("%s"));
  EXPECT_EQ(compose("$M", 1, table), bad(""));
}

TEST(zxsfmt_escapes, one_escape_takes_one_table) {
  zxSA<zxStr> first;
  zxSA<zxStr> second;
  first.ref("n") = "1";
  second.ref("n") = "2";
  EXPECT_EQ(compose("${n}${n}${n}", first, second), good("122"));
  EXPECT_EQ(compose("${n}", first, second), bad("1"));
}

TEST(zxsfmt_escapes, a_table_stays_set_for_later_formats) {
  zxFmtEnv env;
  zxSA<zxStr> table;
  table.ref("n") = "1";
  const Variable variable("N", "v");
  EXPECT_EQ(compose_in(env, "${n}"), good("v"));
  EXPECT_EQ(compose_in(env, "$q", table), bad("$q"));  // even so
  EXPECT_EQ(compose_in(env, "${n}"), good("1"));
  EXPECT_EQ(compose_in(env, "#", 5), good("5"));
  EXPECT_EQ(compose_in(env, "${n}"), good("1"));
  table.ref("n") = "2";
  EXPECT_EQ(compose_in(env, "${n}"), good("2"));
  env.set_table(nullptr);
  EXPECT_EQ(compose_in(env, "${n}"), good("v"));
  env.set_table(&table);
  EXPECT_EQ(compose_in(env, "${n}"), good("2"));
}

TEST(zxsfmt_escapes, a_record_of_no_table_takes_the_table_away) {
  zxFmtEnv env;
  zxSA<zxStr> table;
  table.ref("n") = "1";
  const Variable variable("N", "v");
  const zxFmtArg none(zxFmtArg::k_table, nullptr);
  EXPECT_EQ(compose_in(env, "${n}${n}", table, none), good("1v"));
}

// ---- environments of a program's own

class Sides : public zxFmtEnv {
 public:
  zxStr fmt_left(const zxFmtArg& arg) override { return sfmt("<<# \n", arg); }
  zxStr fmt_right(const zxFmtArg& arg) override {
    return zxStr(arg.tag == 'i' && arg.number == 7 ? "seven>>" : "\n>>");
  }
  zxStr lookup(const zxStr& name) override { return "[" + name + "]"; }
  void set_table(const zxSA<zxStr>* entries) override {
    zxFmtEnv::set_table(entries);
    ++tables;
  }

  int tables = 0;
};

TEST(zxsfmt_escapes, an_environment_has_directives_of_its_own) {
  Sides env;
  EXPECT_EQ(compose_in(env, "a%<b", 5), good("a<<5 \r\nb"));
  EXPECT_EQ(compose_in(env, "%>|%>|", 7, "err"), good("seven>>|\n>>|"));
  EXPECT_EQ(compose_in(env, "%<d", 1), good("<<1 \r\nd"));
  EXPECT_EQ(compose_in(env, "a%<"), bad("a%<"));
  EXPECT_EQ(compose_in(env, "a%>b\n"), bad("a%>b\n"));
  EXPECT_EQ(compose_in(env, "%5<", 1), bad("%5<"));
  EXPECT_EQ(compose("<%<%>>", 1, "x"), good("<>"));
}

TEST(zxsfmt_escapes, an_environment_looks_names_up_as_they_are) {
  Sides env;
  EXPECT_EQ(compose_in(env, "${Name_1}$%x%${}"), good("[Name_1][x][]"));
  EXPECT_EQ(compose_in(env, "${1"), compose("${1"));
  zxSA<zxStr> table;
  EXPECT_EQ(compose_in(env, "$M$M", table, table), good(""));
  EXPECT_EQ(env.tables, 2);
}

// The entries by what they make of a format and a record.
using Entry = std::function<void(const char*, const zxFmtArg&)>;

std::string said;

const std::vector<Entry>& entries() {
  static const std::vector<Entry> k_entries = {
      [](const char* format, const zxFmtArg& arg) {
        said = text_of(sfmt(format, arg));
      },
      [](const char* format, const zxFmtArg& arg) {
        zxStr text;
        said = text_of(sfmt_to(text, format, arg));
      },
      [](const char* format, const zxFmtArg& arg) {
        zxStr text;
        EXPECT_TRUE(sfmt_try(text, format, arg));
        said = text_of(text);
      },
      [](const char* format, const zxFmtArg& arg) {
        zxStr text;
        EXPECT_TRUE(sfmt_try_s(text, zxStr(format), arg));
        said = text_of(text);
      },
      [](const char* format, const zxFmtArg& arg) {
        said = kit::failure_of([&] { bailf(format, arg); }).message;
      },
      [](const char* format, const zxFmtArg& arg) {
        const std::string message =
            kit::failure_of([&] { bailfn(99, format, arg); }).message;
        said = message.substr(message.find(' ') + 1);
      },
      [](const char* format, const zxFmtArg& arg) {
        const kit::TempDir folder;
        zxBFile file;
        file.create(folder.file("x").c_str());
        std::swap(g_stderr.handle, file.handle);
        eprint(format, arg);
        std::swap(g_stderr.handle, file.handle);
        file.close();
        said = kit::read_file(folder.file("x"));
      },
      [](const char* format, const zxFmtArg& arg) {
        const kit::TempDir folder;
        zxBFile file;
        file.create(folder.file("x").c_str());
        std::swap(g_stdout.handle, file.handle);
        oprint(format, arg);
        std::swap(g_stdout.handle, file.handle);
        file.close();
        said = kit::read_file(folder.file("x"));
      },
      [](const char* format, const zxFmtArg& arg) {
        zxplat::process.debug_output = [](const char* text) { said = text; };
        dprint(format, arg);
        zxplat::process.debug_output = zxplat::system_process.debug_output;
      },
      [](const char* format, const zxFmtArg& arg) {
        const kit::TempDir folder;
        zxBFile file;
        file.create(folder.file("x").c_str());
        fprint(file, format, arg);
        file.close();
        said = kit::read_file(folder.file("x"));
      },
  };
  return k_entries;
}

TEST(zxsfmt_escapes, each_entry_has_a_table_of_its_own_that_stays) {
  ASSERT_EQ(entries().size(), 10U);
  const Variable variable("ZX_SFMT_N", "v");
  std::vector<std::string> names;
  static zxSA<zxStr> tables[10];
  for (std::size_t i = 0; i < 10; ++i) {
    tables[i].ref("zx_sfmt_n") = std::to_string(i).c_str();
    entries()[i]("${zx_sfmt_n}#", 0);
    EXPECT_EQ(said, "v0") << i;
  }
  for (std::size_t i = 0; i < 10; ++i) {
    entries()[i]("${zx_sfmt_n}", tables[i]);
    EXPECT_EQ(said, std::to_string(i));
  }
  for (std::size_t i = 0; i < 10; ++i) {
    entries()[i]("${zx_sfmt_n}#", 0);
    EXPECT_EQ(said, std::to_string(i) + "0");
    entries()[i]("${zx_sfmt_n}", zxFmtArg(zxFmtArg::k_table, nullptr));
    EXPECT_EQ(said, "v") << i;
  }
}

// ---- lists

TEST(zxsfmt_escapes, a_list_stands_for_an_argument_for_each_element) {
  const format_run::Lists lists;
  List two = {1, "two"};
  EXPECT_EQ(compose("# #", list_of(two)), good("1 two"));
  EXPECT_TRUE(two.empty());
  List three = {1, 2.5, '3'};
  EXPECT_EQ(compose("#|%s|%d|%.1f|%c", 0, "s", list_of(three)),
            good("0|s|1|2.5|3"));
  List star = {5, 42};
  EXPECT_EQ(compose("%*d", list_of(star)), good("   42"));
  List sides = {7, 7};
  Sides env;
  EXPECT_EQ(compose_in(env, "%>%>", list_of(sides)), good("seven>>seven>>"));
}

TEST(zxsfmt_escapes, elements_left_over_fail_and_stay_in_the_list) {
  const format_run::Lists lists;
  List two = {1, 2};
  EXPECT_EQ(compose("#", list_of(two)), bad("1"));
  EXPECT_EQ(two.size(), 1U);
  List untouched = {1};
  EXPECT_EQ(compose("abc", list_of(untouched)), bad("abc"));
  EXPECT_EQ(untouched.size(), 1U);
}

TEST(zxsfmt_escapes, an_empty_list_is_a_missing_argument) {
  const format_run::Lists lists;
  List none;
  EXPECT_EQ(compose("a#b", list_of(none)), bad("a#b"));
  EXPECT_EQ(compose("a%db", list_of(none)), bad("a%db"));
  EXPECT_EQ(compose("a%<b", list_of(none)), bad("a%<b"));
  EXPECT_EQ(compose("a%*db", list_of(none)), bad("a"));
  EXPECT_EQ(compose("a", list_of(none)), bad("a"));
  List one = {1};
  EXPECT_EQ(compose("##b #c", list_of(one)), good("#b 1c"));
  one = {1};
  EXPECT_EQ(compose("#a#b", list_of(one)), bad("1a#b"));
}

TEST(zxsfmt_escapes, what_stands_behind_a_list_is_ignored) {
  const format_run::Lists lists;
  List one = {1};
  EXPECT_EQ(compose("#", list_of(one), 2, 3), good("1"));
  one = {1};
  EXPECT_EQ(compose("#a#", list_of(one), 2, 3), bad("1a#"));
  List none;
  EXPECT_EQ(compose("#", list_of(none), 2), bad("#"));
}

TEST(zxsfmt_escapes, elements_have_forms_of_their_own) {
  const format_run::Lists lists;
  List list = {format_run::boolean(true), format_run::boolean(false), 'x'};
  EXPECT_EQ(compose("# # #", list_of(list)), good("true false x"));
  list = {format_run::nothing()};
  EXPECT_EQ(compose("a%sb", list_of(list)), bad("a%sb"));
  list = {format_run::nothing()};
  EXPECT_SFMT_ASSERTION(compose("#", list_of(list)));
  list = {"err", 2};
  EXPECT_EQ(compose("a%sb#", list_of(list)), good("errb2"));
}

// A table in a list is no table ahead of an escape.
TEST(zxsfmt_escapes, an_escape_does_not_look_into_a_list) {
  const format_run::Lists lists;
  zxSA<zxStr> table;
  List list = {table};
  EXPECT_EQ(compose("$M", list_of(list)), bad(""));
  EXPECT_EQ(list.size(), 1U);
}

}  // namespace
