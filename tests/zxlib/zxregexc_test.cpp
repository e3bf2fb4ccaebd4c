// zxregexc_test.cpp - the pattern compiler: whole programs as text, what is
// accepted and what is refused, limits just inside and just outside, failures
// with their whole messages, damaged programs.
// Tests zxlib/zxregexc.h, zxregexc.cpp and zxregexc_dump.cpp.
#include "zxregexc.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

#include "kit/failure.h"
#include "regex_run.h"

namespace {

using kit::line_of;
using regex_run::at_the_end_of_memory;
using regex_run::check;
using regex_run::Program;
using regex_run::shown;
using namespace std::string_view_literals;

std::string dump_of(const zxRegex* regex) {
  const zxStr text = regex_dump(*regex);
  return std::string(text.view());
}

std::string times(int count, std::string_view text) {
  std::string all;
  for (int i = 0; i < count; ++i) all += text;
  return all;
}

void expect_refused(std::string_view pattern) {
  SCOPED_TRACE(shown(pattern));
  EXPECT_FALSE(check(pattern));
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(Program(pattern).get(), nullptr); });
}

void expect_accepted(std::string_view pattern) {
  SCOPED_TRACE(shown(pattern));
  EXPECT_TRUE(check(pattern));
  const Program program(pattern);
  ASSERT_NE(program.get(), nullptr);
  EXPECT_TRUE(regex_is_sound(*program.get()));
}

// ---- programs

struct Row {
  std::string_view pattern;
  const char* program;  // behind a line feed
};

constexpr Row k_programs[] = {
    // ---- what stands alone
    {""sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 7
4 NOTHING -> 7
7 END
)"},
    {"a"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "a" -> 10
10 END
)"},
    {"abc"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 12
4 EXACTLY "abc" -> 12
12 END
)"},
    {"."sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 7
4 ANY -> 7
7 END
)"},
    {"^"sv, R"(
regstart 255 reganch 1 regmust ""
1 BRANCH -> 7
4 BOL -> 7
7 END
)"},
    {"$"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 7
4 EOL -> 7
7 END
)"},
    {"^a$"sv, R"(
regstart 97 reganch 2 regmust ""
1 BRANCH -> 16
4 BOL -> 7
7 EXACTLY "a" -> 13
13 EOL -> 16
16 END
)"},
    {"^.a"sv, R"(
regstart 255 reganch 1 regmust ""
1 BRANCH -> 16
4 BOL -> 7
7 ANY -> 10
10 EXACTLY "a" -> 16
16 END
)"},
    // ---- alternatives
    {"a|b"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "a" -> 19
10 BRANCH -> 19
13 EXACTLY "b" -> 19
19 END
)"},
    {"a|"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "a" -> 16
10 BRANCH -> 16
13 NOTHING -> 16
16 END
)"},
    {"|a"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 7
4 NOTHING -> 16
7 BRANCH -> 16
10 EXACTLY "a" -> 16
16 END
)"},
    {"^a|b"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 13
4 BOL -> 7
7 EXACTLY "a" -> 22
13 BRANCH -> 22
16 EXACTLY "b" -> 22
22 END
)"},
    {"a*bc|d"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 20
4 STAR -> 13
7 EXACTLY "a"
13 EXACTLY "bc" -> 29
20 BRANCH -> 29
23 EXACTLY "d" -> 29
29 END
)"},
    // ---- groups
    {"(a)"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 19
4 OPEN 1 -> 7
7 BRANCH -> 16
10 EXACTLY "a" -> 16
16 CLOSE 1 -> 19
19 END
)"},
    {"()"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 16
4 OPEN 1 -> 7
7 BRANCH -> 13
10 NOTHING -> 13
13 CLOSE 1 -> 16
16 END
)"},
    {"(a)(b)"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 34
4 OPEN 1 -> 7
7 BRANCH -> 16
10 EXACTLY "a" -> 16
16 CLOSE 1 -> 19
19 OPEN 2 -> 22
22 BRANCH -> 31
25 EXACTLY "b" -> 31
31 CLOSE 2 -> 34
34 END
)"},
    {"((a))"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 28
4 OPEN 1 -> 7
7 BRANCH -> 25
10 OPEN 2 -> 13
13 BRANCH -> 22
16 EXACTLY "a" -> 22
22 CLOSE 2 -> 25
25 CLOSE 1 -> 28
28 END
)"},
    {"(a)|(b)"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 19
4 OPEN 1 -> 7
7 BRANCH -> 16
10 EXACTLY "a" -> 16
16 CLOSE 1 -> 37
19 BRANCH -> 37
22 OPEN 2 -> 25
25 BRANCH -> 34
28 EXACTLY "b" -> 34
34 CLOSE 2 -> 37
37 END
)"},
    {"{{a|b}}c"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 34
4 OPEN0 -> 7
7 BRANCH -> 16
10 EXACTLY "a" -> 25
16 BRANCH -> 25
19 EXACTLY "b" -> 25
25 CLOSE0 -> 28
28 EXACTLY "c" -> 34
34 END
)"},
    {"{{}}"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 16
4 OPEN0 -> 7
7 BRANCH -> 13
10 NOTHING -> 13
13 CLOSE0 -> 16
16 END
)"},
    // ---- quantifiers on what takes one byte
    {"a*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 13
4 STAR -> 13
7 EXACTLY "a"
13 END
)"},
    {"a+"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 13
4 PLUS -> 13
7 EXACTLY "a"
13 END
)"},
    {"a*?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 13
4 STARMIN -> 13
7 EXACTLY "a"
13 END
)"},
    {"a+?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 13
4 PLUSMIN -> 13
7 EXACTLY "a"
13 END
)"},
    {"a?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 19
4 BRANCH -> 13
7 EXACTLY "a" -> 16
13 BRANCH -> 16
16 NOTHING -> 19
19 END
)"},
    {"a{2,3}"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 17
4 CURLY 2 3 -> 17
11 EXACTLY "a"
17 END
)"},
    {"a{2}"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 17
4 CURLY 2 2 -> 17
11 EXACTLY "a"
17 END
)"},
    {"a{2,}"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 17
4 CURLY 2 32767 -> 17
11 EXACTLY "a"
17 END
)"},
    {"a{0}"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 17
4 CURLY 0 0 -> 17
11 EXACTLY "a"
17 END
)"},
    {"a{32767}"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 17
4 CURLY 32767 32767 -> 17
11 EXACTLY "a"
17 END
)"},
    {"a{2,3}?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 17
4 CURLYMIN 2 3 -> 17
11 EXACTLY "a"
17 END
)"},
    {".{1,}?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 14
4 CURLYMIN 1 32767 -> 14
11 ANY
14 END
)"},
    {"[ab]{3}"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 46
4 CURLY 3 3 -> 46
11 ANYOF [ab]
46 END
)"},
    {"`d*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 10
4 STAR -> 10
7 DIGIT
10 END
)"},
    {"^`d*$"sv, R"(
regstart 255 reganch 1 regmust ""
1 BRANCH -> 16
4 BOL -> 7
7 STAR -> 13
10 DIGIT
13 EOL -> 16
16 END
)"},
    // ---- a quantifier takes the last byte of a literal
    {"ab*c"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 25
4 EXACTLY "a" -> 10
10 STAR -> 19
13 EXACTLY "b"
19 EXACTLY "c" -> 25
25 END
)"},
    {"abc+"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 20
4 EXACTLY "ab" -> 11
11 PLUS -> 20
14 EXACTLY "c"
20 END
)"},
    {"abc?d"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 32
4 EXACTLY "ab" -> 11
11 BRANCH -> 20
14 EXACTLY "c" -> 23
20 BRANCH -> 23
23 NOTHING -> 26
26 EXACTLY "d" -> 32
32 END
)"},
    {"xa{0,2}y"sv, R"(
regstart 120 reganch 0 regmust ""
1 BRANCH -> 29
4 EXACTLY "x" -> 10
10 CURLY 0 2 -> 23
17 EXACTLY "a"
23 EXACTLY "y" -> 29
29 END
)"},
    // ---- quantifiers on everything else
    {"(ab)*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 32
4 BRANCH -> 26
7 OPEN 1 -> 10
10 BRANCH -> 20
13 EXACTLY "ab" -> 20
20 CLOSE 1 -> 23
23 BACK -> 4
26 BRANCH -> 29
29 NOTHING -> 32
32 END
)"},
    {"(ab)+"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 32
4 OPEN 1 -> 7
7 BRANCH -> 17
10 EXACTLY "ab" -> 17
17 CLOSE 1 -> 20
20 BRANCH -> 26
23 BACK -> 4
26 BRANCH -> 29
29 NOTHING -> 32
32 END
)"},
    {"(ab)?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 29
4 BRANCH -> 23
7 OPEN 1 -> 10
10 BRANCH -> 20
13 EXACTLY "ab" -> 20
20 CLOSE 1 -> 26
23 BRANCH -> 26
26 NOTHING -> 29
29 END
)"},
    {"(a*)?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 31
4 BRANCH -> 25
7 OPEN 1 -> 10
10 BRANCH -> 22
13 STAR -> 22
16 EXACTLY "a"
22 CLOSE 1 -> 28
25 BRANCH -> 28
28 NOTHING -> 31
31 END
)"},
    {"{{a|b}}*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 40
4 BRANCH -> 34
7 OPEN0 -> 10
10 BRANCH -> 19
13 EXACTLY "a" -> 28
19 BRANCH -> 28
22 EXACTLY "b" -> 28
28 CLOSE0 -> 31
31 BACK -> 4
34 BRANCH -> 37
37 NOTHING -> 40
40 END
)"},
    {"{{a}}+b"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 37
4 OPEN0 -> 7
7 BRANCH -> 16
10 EXACTLY "a" -> 16
16 CLOSE0 -> 19
19 BRANCH -> 25
22 BACK -> 4
25 BRANCH -> 28
28 NOTHING -> 31
31 EXACTLY "b" -> 37
37 END
)"},
    {"{{(a)}}*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 40
4 BRANCH -> 34
7 OPEN0 -> 10
10 BRANCH -> 28
13 OPEN 1 -> 16
16 BRANCH -> 25
19 EXACTLY "a" -> 25
25 CLOSE 1 -> 28
28 CLOSE0 -> 31
31 BACK -> 4
34 BRANCH -> 37
37 NOTHING -> 40
40 END
)"},
    {"%d?"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 21
4 BRANCH -> 15
7 FIELD 0 -1 -1 0 d -> 18
15 BRANCH -> 18
18 NOTHING -> 21
21 END
)"},
    {"%d*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 24
4 BRANCH -> 18
7 FIELD 0 -1 -1 0 d -> 15
15 BACK -> 4
18 BRANCH -> 21
21 NOTHING -> 24
24 END
)"},
    {"%d+"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 24
4 FIELD 0 -1 -1 0 d -> 12
12 BRANCH -> 18
15 BACK -> 4
18 BRANCH -> 21
21 NOTHING -> 24
24 END
)"},
    {"(a{0,2})*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 38
4 BRANCH -> 32
7 OPEN 1 -> 10
10 BRANCH -> 26
13 CURLY 0 2 -> 26
20 EXACTLY "a"
26 CLOSE 1 -> 29
29 BACK -> 4
32 BRANCH -> 35
35 NOTHING -> 38
38 END
)"},
    // ---- the literal that a match must contain
    {".*abc"sv, R"(
regstart 255 reganch 0 regmust "abc"
1 BRANCH -> 18
4 STAR -> 10
7 ANY
10 EXACTLY "abc" -> 18
18 END
)"},
    {".*ab.cd"sv, R"(
regstart 255 reganch 0 regmust "cd"
1 BRANCH -> 27
4 STAR -> 10
7 ANY
10 EXACTLY "ab" -> 17
17 ANY -> 20
20 EXACTLY "cd" -> 27
27 END
)"},
    {".*abc.de"sv, R"(
regstart 255 reganch 0 regmust "abc"
1 BRANCH -> 28
4 STAR -> 10
7 ANY
10 EXACTLY "abc" -> 18
18 ANY -> 21
21 EXACTLY "de" -> 28
28 END
)"},
    {".+abc"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 18
4 PLUS -> 10
7 ANY
10 EXACTLY "abc" -> 18
18 END
)"},
    {"^?a"sv, R"(
regstart 255 reganch 0 regmust "a"
1 BRANCH -> 22
4 BRANCH -> 10
7 BOL -> 13
10 BRANCH -> 13
13 NOTHING -> 16
16 EXACTLY "a" -> 22
22 END
)"},
    {"x?abc(de)*f"sv, R"(
regstart 255 reganch 0 regmust "abc"
1 BRANCH -> 61
4 BRANCH -> 13
7 EXACTLY "x" -> 16
13 BRANCH -> 16
16 NOTHING -> 19
19 EXACTLY "abc" -> 27
27 BRANCH -> 49
30 OPEN 1 -> 33
33 BRANCH -> 43
36 EXACTLY "de" -> 43
43 CLOSE 1 -> 46
46 BACK -> 27
49 BRANCH -> 52
52 NOTHING -> 55
55 EXACTLY "f" -> 61
61 END
)"},
    {"(a*)bcd"sv, R"(
regstart 255 reganch 0 regmust "bcd"
1 BRANCH -> 30
4 OPEN 1 -> 7
7 BRANCH -> 19
10 STAR -> 19
13 EXACTLY "a"
19 CLOSE 1 -> 22
22 EXACTLY "bcd" -> 30
30 END
)"},
    {"(a|b*)cd"sv, R"(
regstart 255 reganch 0 regmust "cd"
1 BRANCH -> 38
4 OPEN 1 -> 7
7 BRANCH -> 16
10 EXACTLY "a" -> 28
16 BRANCH -> 28
19 STAR -> 28
22 EXACTLY "b"
28 CLOSE 1 -> 31
31 EXACTLY "cd" -> 38
38 END
)"},
    {".*(abcdef)g"sv, R"(
regstart 255 reganch 0 regmust "g"
1 BRANCH -> 36
4 STAR -> 10
7 ANY
10 OPEN 1 -> 13
13 BRANCH -> 27
16 EXACTLY "abcdef" -> 27
27 CLOSE 1 -> 30
30 EXACTLY "g" -> 36
36 END
)"},
    {".*(ab)+cde"sv, R"(
regstart 255 reganch 0 regmust "cde"
1 BRANCH -> 46
4 STAR -> 10
7 ANY
10 OPEN 1 -> 13
13 BRANCH -> 23
16 EXACTLY "ab" -> 23
23 CLOSE 1 -> 26
26 BRANCH -> 32
29 BACK -> 10
32 BRANCH -> 35
35 NOTHING -> 38
38 EXACTLY "cde" -> 46
46 END
)"},
    {".*(foo)?bar"sv, R"(
regstart 255 reganch 0 regmust "bar"
1 BRANCH -> 44
4 STAR -> 10
7 ANY
10 BRANCH -> 30
13 OPEN 1 -> 16
16 BRANCH -> 27
19 EXACTLY "foo" -> 27
27 CLOSE 1 -> 33
30 BRANCH -> 33
33 NOTHING -> 36
36 EXACTLY "bar" -> 44
44 END
)"},
    // ---- escapes
    {"a`.b"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 22
4 EXACTLY "a" -> 10
10 EXACTLY "." -> 16
16 EXACTLY "b" -> 22
22 END
)"},
    {R"(a\.b)"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 22
4 EXACTLY "a" -> 10
10 EXACTLY "." -> 16
16 EXACTLY "b" -> 22
22 END
)"},
    {"``"sv, R"(
regstart 96 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "`140" -> 10
10 END
)"},
    {R"(\\)"sv, R"(
regstart 92 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "\" -> 10
10 END
)"},
    {"`x"sv, R"(
regstart 120 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "x" -> 10
10 END
)"},
    {"`.*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 13
4 STAR -> 13
7 EXACTLY "."
13 END
)"},
    {"`f`n`r`t"sv, R"(
regstart 12 reganch 0 regmust ""
1 BRANCH -> 28
4 EXACTLY "`014" -> 10
10 EXACTLY "`012" -> 16
16 EXACTLY "`015" -> 22
22 EXACTLY "`011" -> 28
28 END
)"},
    {"`101"sv, R"(
regstart 65 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "A" -> 10
10 END
)"},
    {"`1012"sv, R"(
regstart 65 reganch 0 regmust ""
1 BRANCH -> 16
4 EXACTLY "A" -> 10
10 EXACTLY "2" -> 16
16 END
)"},
    {"`0"sv, R"(
regstart 0 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "`000" -> 10
10 END
)"},
    {"`01"sv, R"(
regstart 0 reganch 0 regmust ""
1 BRANCH -> 16
4 EXACTLY "`000" -> 10
10 EXACTLY "1" -> 16
16 END
)"},
    {"`377"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 10
4 EXACTLY "`377" -> 10
10 END
)"},
    {"(a)`1"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 24
4 OPEN 1 -> 7
7 BRANCH -> 16
10 EXACTLY "a" -> 16
16 CLOSE 1 -> 19
19 BACKREF 1 -> 24
24 END
)"},
    {"`9"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 9
4 BACKREF 9 -> 9
9 END
)"},
    {"`12"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 15
4 BACKREF 1 -> 9
9 EXACTLY "2" -> 15
15 END
)"},
    {"`a`A`d`D`h`H`s`S`w`W`b`B"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 40
4 HEBANSI -> 7
7 NHEBANSI -> 10
10 DIGIT -> 13
13 NDIGIT -> 16
16 HEBDOS -> 19
19 NHEBDOS -> 22
22 SPACE -> 25
25 NSPACE -> 28
28 WORD -> 31
31 NWORD -> 34
34 WORDB -> 37
37 NWORDB -> 40
40 END
)"},
    // ---- literals of all bytes
    {R"(a"b)"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 12
4 EXACTLY "a`042b" -> 12
12 END
)"},
    {"a\xff ~"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 13
4 EXACTLY "a`377 ~" -> 13
13 END
)"},
    {"\xe0\xe1"sv, R"(
regstart 224 reganch 0 regmust ""
1 BRANCH -> 11
4 EXACTLY "`340`341" -> 11
11 END
)"},
    {"a\0b"sv, R"(
regstart 97 reganch 0 regmust ""
1 BRANCH -> 12
4 EXACTLY "a`000b" -> 12
12 END
)"},
    // ---- fields
    {"%d"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 12
4 FIELD 0 -1 -1 0 d -> 12
12 END
)"},
    {"%5d%s"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 20
4 FIELD 0 5 -1 0 d -> 12
12 FIELD 1 -1 -1 0 s -> 20
20 END
)"},
    {"^%0C$"sv, R"(
regstart 255 reganch 1 regmust ""
1 BRANCH -> 18
4 BOL -> 7
7 FIELD 0 -1 -1 1 C -> 15
15 EOL -> 18
18 END
)"},
    {"%foo"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 19
4 FIELD 0 -1 -1 0 f -> 12
12 EXACTLY "oo" -> 19
19 END
)"},
    {"(%d)*"sv, R"(
regstart 255 reganch 0 regmust ""
1 BRANCH -> 33
4 BRANCH -> 27
7 OPEN 1 -> 10
10 BRANCH -> 21
13 FIELD 0 -1 -1 0 d -> 21
21 CLOSE 1 -> 24
24 BACK -> 4
27 BRANCH -> 30
30 NOTHING -> 33
33 END
)"},
};

TEST(zxregexc, patterns_become_these_programs) {
  for (const Row& row : k_programs) {
    SCOPED_TRACE(shown(row.pattern));
    const Program program(row.pattern);
    EXPECT_EQ(dump_of(program.get()), row.program + 1);
    EXPECT_TRUE(regex_is_sound(*program.get()));
    EXPECT_TRUE(check(row.pattern));
  }
}

// The backslash is the same escape as the backtick.
TEST(zxregexc, a_backslash_escapes_as_a_backtick_does) {
  for (const Row& row : k_programs) {
    if (row.pattern.find('\\') != std::string_view::npos) continue;
    if (row.pattern.find("``") != std::string_view::npos) continue;
    std::string pattern(row.pattern);
    std::replace(pattern.begin(), pattern.end(), '`', '\\');
    EXPECT_EQ(dump_of(Program(pattern).get()), row.program + 1) << pattern;
  }
}

TEST(zxregexc, a_program_has_its_header_and_its_size) {
  const Program anchored("^abc");
  EXPECT_EQ(anchored.get()->regstart, 'a');
  EXPECT_EQ(anchored.get()->reganch, 2);
  EXPECT_EQ(anchored.get()->regmust, nullptr);
  EXPECT_EQ(anchored.get()->regmlen, 0U);
  EXPECT_EQ(anchored.get()->magic, 156);
  EXPECT_EQ(anchored.get()->program()[0], 156);
  EXPECT_EQ(anchored.get()->size, 1U + 3 + 3 + 8 + 3);
  const Program filtered(".*abc`0d");
  EXPECT_EQ(filtered.get()->regstart, k_regex_no_start);
  EXPECT_EQ(filtered.get()->reganch, 0);
  ASSERT_EQ(filtered.get()->regmlen, 3U);
  EXPECT_EQ(std::memcmp(filtered.get()->regmust, "abc", 3), 0);
}

// Opcode, link and operands of each kind of node, highest byte first.
TEST(zxregexc, nodes_are_these_bytes) {
  const Program program("(a`2)+x{2,300}%+=5.1xz");
  const unsigned char expected[] = {156,                        // magic
                                    6,   0, 62,                 // BRANCH
                                    31,  0, 3,                  // OPEN 1
                                    6,   0, 14,                 // BRANCH
                                    8,   0, 6,  1, 'a', 0,      // EXACTLY
                                    50,  0, 5,  0, 2,           // BACKREF
                                    41,  0, 3,                  // CLOSE 1
                                    6,   0, 6,                  // BRANCH
                                    7,   0, 23,                 // BACK
                                    6,   0, 3,                  // BRANCH
                                    9,   0, 3,                  // NOTHING
                                    51,  0, 13, 0, 2,   1, 44,  // CURLY
                                    8,   0, 0,  1, 'x', 0,      // its EXACTLY
                                    54,  0, 8,  0, 5,   1, 80, 'x',  // FIELD
                                    8,   0, 6,  1, 'z', 0,           // EXACTLY
                                    0,   0, 0};                      // END
  ASSERT_EQ(program.get()->size, sizeof expected);
  for (std::size_t i = 0; i < sizeof expected; ++i)
    EXPECT_EQ(program.get()->program()[i], expected[i]) << i;
}

// The bitmap of a class holds what is not in it.
TEST(zxregexc, the_bitmap_of_a_class_is_its_complement) {
  const Program program("[`001a]");
  const std::uint8_t* const node = program.get()->program() + 4;
  EXPECT_EQ(node[0], 4);
  int clear = 0;
  for (int i = 3; i < 35; ++i) {
    for (int bit = 0; bit < 8; ++bit) clear += (node[i] >> bit & 1) == 0;
  }
  EXPECT_EQ(clear, 2);
}

// ---- classes

struct ClassRow {
  std::string_view pattern;
  const char* members;
};

constexpr ClassRow k_classes[] = {
    {"[abc]"sv, "a-c"},
    {"[ab]"sv, "ab"},
    {"[cba]"sv, "a-c"},
    {"[aaa]"sv, "a"},
    {"[a-a]"sv, "a"},
    {"[a-cx]"sv, "a-cx"},
    {"[xa-c]"sv, "a-cx"},
    {"[a-cb-d]"sv, "a-d"},
    {"[]a]"sv, "`135a"},
    {"[-a]"sv, "`055a"},
    {"[a-]"sv, "`055a"},
    {"[^a]"sv, "`000-`140b-`377"},
    {"[^]a]"sv, "`000-\\`136-`140b-`377"},
    {"[^-a]"sv, "`000-,.-`140b-`377"},
    {"[^a-]"sv, "`000-,.-`140b-`377"},
    {"[a^]"sv, "`136a"},
    {"[.*+?$|(){}%]"sv, "$%(-+.?{-}"},
    {"[ -~]"sv, " -~"},
    {"[\"]"sv, "`042"},
    {"[[]"sv, "["},
    {"[`]]"sv, "`135"},
    {"[`^`-`\\]"sv, "`055\\`136"},
    {"[\\^\\-\\`]"sv, "`055`136`140"},
    {"[`d`s]"sv, "`011-`015 0-9"},
    {"[x`d]"sv, "0-9x"},
    {"[`d-]"sv, "`0550-9"},
    {"[`d]"sv, "0-9"},
    {"[`D]"sv, "`000-/:-`377"},
    {"[^`d]"sv, "`000-/:-`377"},
    {"[`w]"sv, "0-9A-Za-z"},
    {"[`W]"sv, "`000-/:-@[-`140{-`377"},
    {"[`s]"sv, "`011-`015 "},
    {"[`S]"sv, "`000-`010`016-`037!-`377"},
    {"[`h]"sv, "`200-`232"},
    {"[`H]"sv, "`000-`177`233-`377"},
    {"[`a]"sv, "`340-`372"},
    {"[`A]"sv, "`000-`337`373-`377"},
    {"[`d`D]"sv, "`000-`377"},
    {"[^`d`D]"sv, ""},
    {"[`b`B]"sv, "Bb"},
    {"[`x]"sv, "x"},
    {"[`f`n`r`t]"sv, "`011`012`014`015"},
    {"[`141`0`7`.]"sv, "`000.7a"},
    {"[`1011]"sv, "1A"},
    {"[`000-`377]"sv, "`000-`377"},
    {"[^`000-`377]"sv, ""},
    {"[`141-c]"sv, "a-c"},
    {"[a-`143]"sv, "a-c"},
    {"[`t-`r]"sv, "`011-`015"},
    {"[\0-\2]"sv, "`000-`002"},
    {"[\xe0-\xfa]"sv, "`340-`372"},
    {"[z-\x80]"sv, "z-`200"},
};

TEST(zxregexc, classes_have_these_members) {
  for (const ClassRow& row : k_classes) {
    SCOPED_TRACE(shown(row.pattern));
    const Program program(row.pattern);
    EXPECT_EQ(dump_of(program.get()),
              "regstart 255 reganch 0 regmust \"\"\n1 BRANCH -> 39\n4 ANYOF [" +
                  std::string(row.members) + "] -> 39\n39 END\n");
    EXPECT_TRUE(regex_is_sound(*program.get()));
  }
}

TEST(zxregexc, classes_are_refused_that_do_not_end_or_go_backward) {
  for (const std::string_view pattern :
       {"["sv, "[]"sv, "[^"sv, "[^]"sv, "[a"sv, "[a-"sv, "[a-z"sv, "[`"sv,
        "[a`"sv, "[a-`"sv, "[`]"sv, "[z-a]"sv, "[\xfa-\xe0]"sv, "[\x80-z]"sv,
        "[a-`d]"sv, "[a-`W]"sv, "[`400]"sv, "[`777]"sv}) {
    expect_refused(pattern);
  }
}

// ---- escapes

TEST(zxregexc, every_byte_that_has_no_meaning_is_itself_behind_an_escape) {
  constexpr std::string_view k_meaning = "0123456789aAdDhHsSwWbBfnrt";
  for (int byte = 0; byte < 256; ++byte) {
    const char c = static_cast<char>(byte);
    if (k_meaning.find(c) != std::string_view::npos) continue;
    const Program program(std::string("`") + c);
    ASSERT_NE(program.get(), nullptr) << byte;
    const std::uint8_t* const node = program.get()->program() + 4;
    const std::uint8_t expected[] = {
        8, 0, 6, 1, static_cast<std::uint8_t>(byte), 0};
    EXPECT_EQ(program.get()->size, 1U + 3 + 6 + 3);
    EXPECT_EQ(std::memcmp(node, expected, sizeof expected), 0) << byte;
  }
}

TEST(zxregexc, three_digits_are_an_octal_byte_or_refused) {
  for (int number = 0; number < 1000; ++number) {
    char digits[4] = {static_cast<char>('0' + number / 100),
                      static_cast<char>('0' + number / 10 % 10),
                      static_cast<char>('0' + number % 10), 0};
    const std::string pattern = std::string("`") + digits;
    const bool octal = std::strpbrk(digits, "89") == nullptr;
    const long value = std::strtol(digits, nullptr, 8);
    if (!octal || value > 255) {
      expect_refused(pattern);
      continue;
    }
    const Program program(pattern);
    ASSERT_NE(program.get(), nullptr) << pattern;
    EXPECT_EQ(program.get()->program()[4], 8) << pattern;
    EXPECT_EQ(program.get()->program()[7], 1) << pattern;
    EXPECT_EQ(program.get()->program()[8], value) << pattern;
  }
}

TEST(zxregexc, one_digit_refers_back_to_a_group) {
  for (int group = 1; group <= 9; ++group) {
    const std::string digit = std::to_string(group);
    EXPECT_EQ(dump_of(Program("`" + digit).get()),
              "regstart 255 reganch 0 regmust \"\"\n1 BRANCH -> 9\n"
              "4 BACKREF " +
                  digit + " -> 9\n9 END\n");
  }
}

TEST(zxregexc, an_escape_at_the_end_is_refused) {
  for (const std::string_view pattern :
       {"`"sv, "\\"sv, "a`"sv, "a\\"sv, "(`"sv, "```"sv, "`\\\\"sv})
    expect_refused(pattern);
}

// ---- fields

struct FieldRow {
  const char* pattern;
  const char* operands;
};

constexpr FieldRow k_fields[] = {
    {"%d", "-1 -1 0 d"},         {"%x", "-1 -1 0 x"},
    {"%f", "-1 -1 0 f"},         {"%v", "-1 -1 0 v"},
    {"%s", "-1 -1 0 s"},         {"%t", "-1 -1 0 t"},
    {"%C", "-1 -1 0 C"},         {"%0d", "-1 -1 1 d"},
    {"%*d", "-1 -1 2 d"},        {"% d", "-1 -1 4 d"},
    {"%+d", "-1 -1 16 d"},       {"%-d", "-1 -1 32 d"},
    {"%=d", "-1 -1 64 d"},       {"%0* +-=d", "-1 -1 119 d"},
    {"%=-+ *0d", "-1 -1 119 d"}, {"%00d", "-1 -1 1 d"},
    {"%5d", "5 -1 0 d"},         {"%05d", "5 -1 1 d"},
    {"%10d", "10 -1 0 d"},       {"%127d", "127 -1 0 d"},
    {"%_d", "3 -1 0 d"},         {"%___d", "5 -1 0 d"},
    {"%0_d", "4 -1 1 d"},        {"%_+d", "4 -1 16 d"},
    {"%_.2d", "5 2 0 d"},        {"%5_d", "5 -1 0 d"},
    {"%.d", "-1 0 0 d"},         {"%.3d", "-1 3 0 d"},
    {"%5.d", "5 0 0 d"},         {"% +5.2f", "5 2 20 f"},
    {"%5ad", "5 -1 0 d"},        {"%a5d", "-1 -1 0 d"},
    {"%5.2yzd", "5 2 0 d"},      {"%%d", "-1 -1 0 d"},
    {"%(d", "-1 -1 0 d"},        {"% s", "-1 -1 4 s"},
    {"%3s", "3 -1 0 s"},         {"%+C", "-1 -1 16 C"},
    {"%=t", "-1 -1 64 t"},
};

TEST(zxregexc, fields_have_these_operands) {
  for (const FieldRow& row : k_fields) {
    EXPECT_EQ(dump_of(Program(row.pattern).get()),
              std::string("regstart 255 reganch 0 regmust \"\"\n"
                          "1 BRANCH -> 12\n4 FIELD 0 ") +
                  row.operands + " -> 12\n12 END\n")
        << row.pattern;
  }
}

TEST(zxregexc, fields_are_refused_without_a_type_or_against_it) {
  for (const std::string_view pattern :
       {"%"sv, "%5"sv, "%5."sv, "%abe"sv, "%D"sv, "%c"sv, "%%"sv, "a%"sv,
        "(%)"sv, "%+s"sv, "%=s"sv, "%+5s"sv, "%0=s"sv, "%_5d"sv, "%_05d"sv}) {
    expect_refused(pattern);
  }
}

TEST(zxregexc, a_field_is_at_most_127_wide) {
  expect_accepted("%127d");
  expect_accepted("%127s");
  expect_refused("%128d");
  expect_refused("%255d");
  expect_refused("%256d");
  expect_refused("%261d");
  expect_refused("%4294967301d");
  expect_refused("%99999999999999999999d");
  EXPECT_EQ(Program("%" + times(125, "_") + "d").get()->program()[8], 127);
  expect_refused("%" + times(126, "_") + "d");
}

TEST(zxregexc, a_pattern_has_at_most_19_fields) {
  const Program program(times(19, "%d"));
  ASSERT_NE(program.get(), nullptr);
  for (int i = 0; i < 19; ++i) {
    EXPECT_EQ(program.get()->program()[4 + 8 * i], 54);
    EXPECT_EQ(program.get()->program()[4 + 8 * i + 3], i);
  }
  expect_accepted(times(19, "%s"));
  expect_refused(times(20, "%d"));
  expect_refused(times(19, "(%d|") + "%d" + times(19, ")"));
}

// ---- groups

TEST(zxregexc, nine_groups_capture) {
  const std::string dump = dump_of(Program(times(9, "()")).get());
  for (int group = 1; group <= 9; ++group) {
    const std::string number = std::to_string(group);
    EXPECT_NE(dump.find(" OPEN " + number + " ->"), std::string::npos);
    EXPECT_NE(dump.find(" CLOSE " + number + " ->"), std::string::npos);
  }
}

// The second and the third group beyond the limit pass on what they hold;
// none of their nodes is a reference or an end of group 0 or 1.
TEST(zxregexc, two_groups_beyond_the_ninth_do_not_capture) {
  const auto count = [](const std::string& text, const std::string& what) {
    int found = 0;
    for (std::size_t i = 0; (i = text.find(what, i)) != std::string::npos; ++i)
      ++found;
    return found;
  };
  for (int groups = 10; groups <= 11; ++groups) {
    expect_accepted(times(groups, "(a)"));
    expect_accepted(times(groups, "(") + times(groups, ")"));
    const std::string dump = dump_of(Program(times(groups, "(a)")).get());
    EXPECT_EQ(count(dump, " OPEN "), 9);
    EXPECT_EQ(count(dump, " CLOSE "), 9);
    EXPECT_EQ(count(dump, "BACKREF"), 0);
    EXPECT_EQ(count(dump, "EXACTLY \"a\""), groups);
  }
}

TEST(zxregexc, a_twelfth_group_is_refused) {
  expect_refused(times(12, "()"));
  expect_refused(times(12, "(") + times(12, ")"));
  expect_refused(times(11, "()") + "(");
}

TEST(zxregexc, a_group_without_capture_is_refused_behind_eleven_that_capture) {
  expect_accepted(times(10, "()") + "{{a}}");
  expect_accepted("{{a}}" + times(11, "()"));
  expect_refused(times(11, "()") + "{{a}}");
  expect_refused(times(11, "(") + "{{a}}" + times(11, ")"));
}

TEST(zxregexc, a_group_is_closed_by_what_opened_it) {
  for (const std::string_view pattern :
       {"("sv,     ")"sv,      "(a"sv,      "a)"sv,      "((a)"sv,
        "(a))"sv,  "{{"sv,     "}}"sv,      "{{a"sv,     "a}}"sv,
        "{{a}"sv,  "{{a)"sv,   "(a}}"sv,    "({{a)}}"sv, "{{(a}})"sv,
        "(a}})"sv, "{{a)}}"sv, "{{a}}}}"sv, "{{{{a}}"sv, "a|)"sv,
        "|}}"sv}) {
    expect_refused(pattern);
  }
  for (const std::string_view pattern :
       {"()"sv, "{{}}"sv, "(|)"sv, "{{|}}"sv, "({{(a)}})"sv, "{{{{a}}}}"sv,
        "((((a))))"sv, "(a|{{b|(c)}}|)"sv, "||"sv}) {
    expect_accepted(pattern);
  }
}

// ---- quantifiers

TEST(zxregexc, a_quantifier_needs_an_atom) {
  for (const std::string_view pattern :
       {"*"sv, "+"sv, "?"sv, "*a"sv, "+a"sv, "?a"sv, "a|*"sv, "a|+b"sv, "(*)"sv,
        "(?a)"sv, "{{+}}"sv, "(|?)"sv, "{2}"sv, "{2,}"sv, "{2,3}"sv, "a|{2}"sv,
        "({2})"sv}) {
    expect_refused(pattern);
  }
}

TEST(zxregexc, a_repeated_atom_cannot_match_empty) {
  for (const std::string_view pattern :
       {"^*"sv,      "^+"sv,      "$*"sv,      "(^)+"sv,      "(^)*"sv,
        "()*"sv,     "()+"sv,     "(a*)*"sv,   "(a*)+"sv,     "(a?)*"sv,
        "(a|)*"sv,   "(a|b*)+"sv, "`b*"sv,     "`B+"sv,       "`1*"sv,
        "`1+"sv,     "(`1)*"sv,   "% d*"sv,    "% d+"sv,      "% s*"sv,
        "(% d)*"sv,  "{{}}*"sv,   "{{a*}}+"sv, "({{a*}})*"sv, "(a*b?)*"sv,
        "((a)?)*"sv, "(^$)*"sv,   "((ab)*)*"sv}) {
    expect_refused(pattern);
  }
  for (const std::string_view pattern :
       {"^?"sv,         "$?"sv,     "()?"sv,     "(a*)?"sv,     "`b?"sv,
        "`1?"sv,        "% d?"sv,   "{{}}?"sv,   "(a*b)*"sv,    "(a|b)*"sv,
        "(a+)*"sv,      "(^a)*"sv,  "(a$)+"sv,   "((ab)+)*"sv,  "%d*"sv,
        "% 5d*"sv,      "%s+"sv,    "% _d+"sv,   "(a{0,2})*"sv, "(a{0})+"sv,
        "(a{0,2}?)*"sv, "(`1a)*"sv, "(a*|b)?"sv, "(a)?(b)*"sv}) {
    expect_accepted(pattern);
  }
}

TEST(zxregexc, a_piece_has_one_quantifier) {
  for (const std::string_view pattern :
       {"a**"sv,     "a*+"sv,     "a+*"sv,    "a++"sv,      "a?*"sv,
        "a?+"sv,     "a??"sv,     "a*??"sv,   "a*?*"sv,     "a*?+"sv,
        "a+?*"sv,    "x+?*"sv,    "x**"sv,    "a*{2}"sv,    "a+{2}"sv,
        "a?{2}"sv,   "a{2}{3}"sv, "a{2}*"sv,  "a{2}+"sv,    "a*?{2}"sv,
        "a+?{2,}"sv, "a{2}??"sv,  "a{2}?*"sv, "a{2}?{3}"sv, "(ab)*?"sv,
        "(ab)+?"sv,  "(ab)??"sv,  "(ab)**"sv, "{{a}}*?"sv,  "{{a}}+?"sv,
        "%d*?"sv,    "%d+?"sv,    "(a)?+"sv,  "(a)*{2}"sv,  "^?*"sv}) {
    expect_refused(pattern);
  }
}

TEST(zxregexc, a_count_needs_an_atom_of_one_byte) {
  for (const std::string_view pattern :
       {"(ab){2}"sv, "(a){2}"sv, "{{a}}{2}"sv, "%d{2}"sv, "%5d{2}"sv, "`1{2}"sv,
        "^{2}"sv, "${2}"sv, "`b{2}"sv, "(){2}"sv, "(a){2,3}"sv, "(a){0,}"sv}) {
    expect_refused(pattern);
  }
  for (const std::string_view pattern :
       {"a{2}"sv, "ab{2}"sv, ".{2}"sv, "[ab]{2}"sv, "`d{2}"sv, "`H{2}"sv,
        "`.{2}"sv, "`101{2}"sv, "a{0}"sv, "a{0,0}"sv, "a{2,2}"sv, "a{002,3}"sv,
        "a{2}?"sv, "a{2}b{3}"sv}) {
    expect_accepted(pattern);
  }
}

TEST(zxregexc, a_count_is_at_most_32767_and_its_least_not_above_its_most) {
  for (const std::string_view pattern :
       {"a{32767}"sv, "a{0,32767}"sv, "a{32767,}"sv, "a{32767,32767}?"sv})
    expect_accepted(pattern);
  for (const std::string_view pattern :
       {"a{32768}"sv, "a{0,32768}"sv, "a{32768,}"sv, "a{65537}"sv,
        "a{1,65538}"sv, "a{4294967298}"sv, "a{99999999999999999999}"sv,
        "a{0,99999999999999999999}"sv, "a{3,2}"sv, "a{1,0}"sv,
        "a{32767,1}?"sv}) {
    expect_refused(pattern);
  }
}

// ---- braces that are text

TEST(zxregexc, an_opening_brace_that_counts_nothing_is_text) {
  for (const std::string_view pattern :
       {"{"sv, "a{"sv, "{a"sv, "a{2"sv, "a{2,"sv, "a{2,3"sv, "a{,3"sv, "a{x"sv,
        "a{ 2"sv, "a{-2"sv, "{2"sv, "a*{"sv, "a*{x"sv, "a{2}{"sv, "(a{)"sv,
        "a{|b"sv, "a{*"sv, "{{a{2}}"sv, "a{2,3,4"sv}) {
    if (pattern == "{{a{2}}"sv) {
      expect_refused(pattern);
      continue;
    }
    expect_accepted(pattern);
  }
}

TEST(zxregexc, such_a_brace_allows_one_closing_brace_further_on) {
  for (const std::string_view pattern :
       {"a{x}"sv, "{x}"sv, "{}"sv, "a{,3}"sv, "a{}"sv, "a{x}b{y}"sv,
        "{a{b}c}"sv, "a{2,x}"sv, "a{2, 3}"sv, "a{2x}"sv, "a{2,3,4}"sv})
    expect_accepted(pattern);
  for (const std::string_view pattern :
       {"}"sv, "a}"sv, "a}b"sv, "}{"sv, "a{x}y}"sv, "a{2}}"sv, "a{2}b}"sv,
        "(})"sv, "a|}"sv, "}*"sv}) {
    expect_refused(pattern);
  }
  expect_accepted("a`}");
  expect_accepted("`{a`}");
}

TEST(zxregexc, two_closing_braces_always_end_a_branch) {
  expect_refused("a{x}}");
  expect_refused("{a{b}}");
  expect_refused("{{a}}}");
}

// ---- long literals

std::string literal_node(int place, const std::string& text) {
  const std::string end =
      std::to_string(place + 5 + static_cast<int>(text.size()));
  return std::to_string(place) + " EXACTLY \"" + text + "\" -> " + end + "\n";
}

TEST(zxregexc, a_literal_of_more_than_127_bytes_is_several_nodes) {
  const std::string head = "regstart 97 reganch 0 regmust \"\"\n1 BRANCH -> ";
  const auto letters = [](int count) { return times(count, "a"); };
  EXPECT_EQ(dump_of(Program(letters(127)).get()),
            head + "136\n" + literal_node(4, letters(127)) + "136 END\n");
  EXPECT_EQ(dump_of(Program(letters(128)).get()),
            head + "142\n" + literal_node(4, letters(127)) +
                literal_node(136, "a") + "142 END\n");
  EXPECT_EQ(dump_of(Program(letters(300)).get()),
            head + "319\n" + literal_node(4, letters(127)) +
                literal_node(136, letters(127)) +
                literal_node(268, letters(46)) + "319 END\n");
}

TEST(zxregexc, a_quantifier_takes_the_last_byte_of_a_long_literal) {
  const std::string head = "regstart 97 reganch 0 regmust \"\"\n1 BRANCH -> ";
  const auto letters = [](int count) { return times(count, "a"); };
  EXPECT_EQ(dump_of(Program(letters(127) + "*").get()),
            head + "144\n" + literal_node(4, letters(126)) +
                "135 STAR -> 144\n138 EXACTLY \"a\"\n144 END\n");
  EXPECT_EQ(dump_of(Program(letters(128) + "*").get()),
            head + "145\n" + literal_node(4, letters(127)) +
                "136 STAR -> 145\n139 EXACTLY \"a\"\n145 END\n");
  EXPECT_EQ(dump_of(Program(letters(129) + "{2}").get()),
            head + "155\n" + literal_node(4, letters(127)) +
                literal_node(136, "a") +
                "142 CURLY 2 2 -> 155\n149 EXACTLY \"a\"\n155 END\n");
}

TEST(zxregexc, the_literal_to_be_contained_is_one_node_of_a_long_one) {
  const Program program(".*" + times(127, "a") + times(127, "b") + "ccc");
  ASSERT_EQ(program.get()->regmlen, 127U);
  EXPECT_EQ(std::string(program.get()->regmust, 127), times(127, "b"));
}

// ---- size

// One branch of n bytes has a program of n + 7 bytes.
TEST(zxregexc, a_program_has_at_most_32766_bytes) {
  const std::string largest = "aaa" + times(10917, ".");
  const std::string too_large = "aaaa" + times(10917, ".");
  const Program program(largest);
  ASSERT_NE(program.get(), nullptr);
  EXPECT_EQ(program.get()->size, 32766U);
  EXPECT_TRUE(regex_is_sound(*program.get()));
  EXPECT_TRUE(check(too_large));
  EXPECT_FAILURE(Program{too_large}, "1751: regcomp: too big",
                 line_of(1751, ""));
  kit::with_failures_dropped(
      [&] { EXPECT_EQ(Program(too_large).get(), nullptr); });
}

TEST(zxregexc, a_pattern_may_have_a_link_over_the_whole_program) {
  const Program program(times(10919, "."));
  EXPECT_EQ(program.get()->size, 32764U);
  EXPECT_NE(dump_of(program.get()).find("1 BRANCH -> 32761\n"),
            std::string::npos);
}

TEST(zxregexc, a_pattern_of_a_megabyte_is_checked_and_too_big) {
  const std::string pattern = times(1 << 18, "abc*");
  EXPECT_TRUE(regcheck(pattern.data(), pattern.data() + pattern.size()));
  EXPECT_FAILURE(regcomp(pattern.data(), pattern.data() + pattern.size()),
                 "1751: regcomp: too big", line_of(1751, ""));
}

// ---- deep patterns

bool check_long(const std::string& pattern) {
  return regcheck(pattern.data(), pattern.data() + pattern.size());
}

void expect_failure(const std::string& pattern, int number,
                    const std::string& message, const std::string& text) {
  EXPECT_FAILURE(regcomp(pattern.data(), pattern.data() + pattern.size()),
                 std::to_string(number) + ": " + message,
                 line_of(number, text));
}

TEST(zxregexc, parentheses_nested_very_deeply_are_refused) {
  for (const int depth : {30000, 2000000}) {
    for (const std::string& ending :
         {std::string(), times(depth, ")"), times(depth, "}}")}) {
      const std::string pattern = times(depth, "(") + ending;
      EXPECT_FALSE(check_long(pattern));
      expect_failure(pattern, 1752,
                     "regcomp: bad reg '" + times(140, "(") + "'", pattern);
    }
  }
}

TEST(zxregexc, groups_without_capture_nest_without_limit) {
  for (const int depth : {30000, 2000000}) {
    const std::string open = times(depth, "{{");
    const std::string close = times(depth, "}}");
    EXPECT_TRUE(check_long(open + close));
    EXPECT_TRUE(check_long(open + "a|b" + close));
    expect_failure(open + close, 1751, "regcomp: too big", "");
    EXPECT_FALSE(check_long(open));
    EXPECT_FALSE(check_long(open + close + "}}"));
    EXPECT_FALSE(check_long(open + times(depth, ")")));
    expect_failure(open, 1752, "regcomp: bad reg '" + times(70, "{{") + "'",
                   open);
  }
}

// Each level has nine bytes; the rest takes ten.
TEST(zxregexc, the_deepest_program_has_3639_levels) {
  const std::string deepest = times(3639, "{{") + times(3639, "}}");
  const Program program(deepest);
  ASSERT_NE(program.get(), nullptr);
  EXPECT_EQ(program.get()->size, 3639U * 9 + 10);
  EXPECT_TRUE(regex_is_sound(*program.get()));
  expect_failure("{{" + deepest + "}}", 1751, "regcomp: too big", "");
}

// ---- failures

TEST(zxregexc, a_bad_pattern_is_a_failure_with_its_text) {
  expect_failure("a)", 1752, "regcomp: bad reg 'a)'", "a)");
  expect_failure("*", 1752, "regcomp: bad reg '*'", "*");
  expect_failure("(a|b){2}, and more", 1752,
                 "regcomp: bad reg '(a|b){2}, and more'", "(a|b){2}, an");
}

TEST(zxregexc, the_message_holds_140_bytes_of_the_pattern) {
  for (const int size : {139, 140, 141, 5000}) {
    const std::string pattern = times(size - 1, "a") + ")";
    expect_failure(pattern, 1752,
                   "regcomp: bad reg '" + pattern.substr(0, 140) + "'",
                   pattern);
  }
}

TEST(zxregexc, the_message_ends_where_the_pattern_does) {
  const std::string_view pattern = at_the_end_of_memory("ab)");
  EXPECT_FAILURE(regcomp(pattern.data(), pattern.data() + pattern.size()),
                 "1752: regcomp: bad reg 'ab)'", line_of(1752, "ab)"));
  const char longer[] = "a)bcd";
  EXPECT_FAILURE(regcomp(longer, longer + 2), "1752: regcomp: bad reg 'a)'",
                 line_of(1752, "a)"));
}

TEST(zxregexc, the_message_of_a_pattern_with_a_nul_ends_there) {
  expect_failure(std::string("a\0b)", 4), 1752, "regcomp: bad reg 'a'", "a");
}

TEST(zxregexc, a_null_pattern_fails_an_assertion) {
  EXPECT_ASSERTION(regcomp(nullptr, nullptr), "zxregexc");
  EXPECT_ASSERTION(regcheck(nullptr, nullptr), "zxregexc");
  kit::with_failures_dropped([] {
    EXPECT_EQ(regcomp(nullptr, nullptr), nullptr);
    EXPECT_FALSE(regcheck(nullptr, nullptr));
  });
}

TEST(zxregexc, an_end_ahead_of_the_pattern_fails_an_assertion) {
  static const char text[] = "abc";
  EXPECT_ASSERTION(regcomp(text + 1, text), "zxregexc");
  EXPECT_ASSERTION(regcheck(text + 1, text), "zxregexc");
  kit::with_failures_dropped([] {
    EXPECT_EQ(regcomp(text + 1, text), nullptr);
    EXPECT_FALSE(regcheck(text + 1, text));
  });
}

TEST(zxregexc, a_good_pattern_compiles_behind_a_bad_one) {
  expect_refused("((%d[`");
  EXPECT_EQ(dump_of(Program("(%d)").get()),
            "regstart 255 reganch 0 regmust \"\"\n1 BRANCH -> 21\n"
            "4 OPEN 1 -> 7\n7 BRANCH -> 18\n10 FIELD 0 -1 -1 0 d -> 18\n"
            "18 CLOSE 1 -> 21\n21 END\n");
}

// Each start of a pattern ends where memory does.
TEST(zxregexc, nothing_is_read_behind_the_pattern) {
  for (const std::string_view whole :
       {"(a|b)*[^]a-z`d`101]{2,3}?%+05.2d{{`1`101`0x}}+?"sv,
        "[a-`d]a{2,3}{x}}"sv, "`f[`f`000-`377]%___x%=s`777"sv}) {
    for (std::size_t size = 0; size <= whole.size(); ++size) {
      const std::string_view pattern = whole.substr(0, size);
      const bool valid = check(pattern);
      kit::with_failures_dropped(
          [&] { EXPECT_EQ(Program(pattern).get() != nullptr, valid); });
    }
  }
}

// ---- damaged programs

// The program's bytes, to be changed.
std::uint8_t* bytes_of(const Program& program) {
  return const_cast<std::uint8_t*>(program.get()->program());
}

// The places of all nodes, operands of repetitions included.
std::vector<std::size_t> places_of(const zxRegex* regex) {
  std::vector<std::size_t> places;
  const std::string dump = dump_of(regex);
  for (std::size_t at = dump.find('\n') + 1; at < dump.size();
       at = dump.find('\n', at) + 1)
    places.push_back(std::strtoul(dump.c_str() + at, nullptr, 10));
  return places;
}

TEST(zxregexc, a_program_with_an_unknown_node_is_not_sound) {
  for (const Row& row : k_programs) {
    const Program program(row.pattern);
    std::uint8_t* const bytes = bytes_of(program);
    for (const std::size_t place : places_of(program.get())) {
      const std::uint8_t before = bytes[place];
      for (const int opcode : {5, 22, 29, 58, 156, 255}) {
        bytes[place] = static_cast<std::uint8_t>(opcode);
        EXPECT_FALSE(regex_is_sound(*program.get()))
            << shown(row.pattern) << " at " << place << ": " << opcode;
      }
      bytes[place] = before;
    }
    EXPECT_TRUE(regex_is_sound(*program.get()));
  }
}

TEST(zxregexc, a_program_with_a_link_beyond_itself_is_not_sound) {
  for (const Row& row : k_programs) {
    const Program program(row.pattern);
    std::uint8_t* const bytes = bytes_of(program);
    for (const std::size_t place : places_of(program.get())) {
      const std::uint8_t before = bytes[place + 1];
      bytes[place + 1] = 0xFF;
      EXPECT_FALSE(regex_is_sound(*program.get()))
          << shown(row.pattern) << " at " << place;
      bytes[place + 1] = before;
    }
    EXPECT_TRUE(regex_is_sound(*program.get()));
  }
}

TEST(zxregexc, a_program_without_its_start_or_its_end_is_not_sound) {
  for (const Row& row : k_programs) {
    const Program program(row.pattern);
    zxRegex* const regex = program.get();
    regex->magic = 155;
    EXPECT_FALSE(regex_is_sound(*regex)) << shown(row.pattern);
    regex->magic = 156;
    const std::uint32_t size = regex->size;
    for (regex->size = 0; regex->size < size; ++regex->size)
      EXPECT_FALSE(regex_is_sound(*regex)) << shown(row.pattern) << regex->size;
    EXPECT_TRUE(regex_is_sound(*regex));
  }
}

TEST(zxregexc, a_program_whose_literal_runs_beyond_it_is_not_sound) {
  const Program program("abc");
  std::uint8_t* const bytes = bytes_of(program);
  for (const int length : {9, 100, 127, 128, 255}) {
    bytes[7] = static_cast<std::uint8_t>(length);
    EXPECT_FALSE(regex_is_sound(*program.get())) << length;
  }
}

// Whatever the checker says about a damaged program, it comes back.
TEST(zxregexc, every_change_of_one_byte_can_be_checked) {
  int refused = 0;
  int tried = 0;
  for (const Row& row : k_programs) {
    const Program program(row.pattern);
    std::uint8_t* const bytes = bytes_of(program);
    for (std::uint32_t i = 0; i < program.get()->size; ++i) {
      const std::uint8_t before = bytes[i];
      for (int value = 0; value < 256; ++value) {
        bytes[i] = static_cast<std::uint8_t>(value);
        refused += !regex_is_sound(*program.get());
        ++tried;
      }
      bytes[i] = before;
    }
    EXPECT_TRUE(regex_is_sound(*program.get()));
  }
  EXPECT_GT(refused, tried / 3);
}

TEST(zxregexc, many_changes_at_once_can_be_checked) {
  std::uint32_t state = 1;
  const auto next = [&state] {
    state = state * 1664525U + 1013904223U;
    return state >> 16;
  };
  int refused = 0;
  for (const Row& row : k_programs) {
    for (int round = 0; round < 200; ++round) {
      const Program program(row.pattern);
      std::uint8_t* const bytes = bytes_of(program);
      for (std::uint32_t change = 0; change < 2 + next() % 6; ++change)
        bytes[next() % program.get()->size] = static_cast<std::uint8_t>(next());
      refused += !regex_is_sound(*program.get());
    }
  }
  EXPECT_GT(refused, 10000);
}

}  // namespace
