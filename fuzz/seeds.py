#!/usr/bin/env python3
"""Writes the seeds of the fuzz targets, fuzz/corpus/TARGET/seed_*: inputs
that were thought up, from which the fuzzer goes on. Its finds stand beside
them, under names of its own.

    fuzz/seeds.py
"""

import os

HERE = os.path.dirname(os.path.abspath(__file__))

# Pattern, replacement, subject. An input has a count of 8 and a blank ahead
# of them; fuzz/patterns.cpp tells the form.
PATTERNS = [
    # literals and the anchors
    ("", "x", "abc"),
    ("abc", "x", "xxabcxxabc"),
    ("^abc$", "`0`0", "abc"),
    ("^", "x", "abc"),
    ("$", "x", "abc"),
    ("a" * 100 + "b", "", "a" * 150 + "b"),
    ("a`.b\\.c", "-", "axb a.b.c"),
    ("`101`0`377", "`101", "A\0\xff"),
    # bytes and classes
    ("^.*x$", "", "aaax"),
    (".", "`0`0", "a\n\0\xff"),
    ("[a-c]+", "<`0>", "xxabcabcxx"),
    ("[^a-c]+", "<`0>", "xxabcabcxx"),
    ("[]a]", "", "]a["),
    ("[-a]", "", "-a"),
    ("[a-]", "", "-a"),
    ("[`d`s`H`]]+", "", "12 34]"),
    ("[`0`n`t`r`f]", "?", "\0\n\t\r\f"),
    ("`a+`A+", "", "\xe0\xe1abc\xfa"),
    ("`h+`H+", "", "\x80\x9aabc\x9b"),
    ("`w+`W+", "`0", "ab_cd 12"),
    ("`s+$", "", "text  \t \n"),
    ("`d+`D", "`0", "x123y"),
    ("`b`w+`b", "[`0]", "one two three"),
    ("`Boo`B", "", "foot oo"),
    ("`bfoo", "x", "foofoo foo"),
    # repetitions
    ("a*", "x", "baaa"),
    ("a*", "x", "bb"),
    ("a+?b", "", "aaab"),
    ("a*?b", "", "aaab"),
    ("a?b??", "", "abab"),
    ("a{2,3}b", "", "aaaaab"),
    ("a{2}", "", "aaaaa"),
    ("a{2,}?b", "", "aaaab"),
    ("a{0,2}a{1,2}?", "", "aaaa"),
    ("a{2,3x{,2}{y", "", "a{2,3x{,2}{y"),
    # groups and alternatives
    ("(a)(b)(c)(d)(e)(f)(g)(h)(i)", "`9`8`7`6`5`4`3`2`1", "abcdefghi"),
    ("(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)(k)", "`9", "abcdefghijk"),
    ("(a|ab)(c|bcd)(d*)", "`1-`2-`3", "abcd"),
    ("(a*)?", "x", "aa"),
    ("(a|b)*c", "`1", "abababc"),
    ("{{a|b}}*c", "`1", "abababc"),
    ("{{a{0,2}}}+b", "x", "aaab"),
    ("(a{0,2})*b", "`1", "aaac"),
    ("()", "x", "ab"),
    ("a|b|", "one|two|three", "ab"),
    ("^(a|aa)+$", "", "a" * 24 + "b"),
    ("^(.*)(.*)(.*)`d", "", "no digit in here at all"),
    ("(x|)*y", "", "xxy"),
    ("colou?r", "one|two", "color colour"),
    # groups referred back to
    ("(a+)b`1", "`1", "aabaa"),
    ("(a)|b`1", "`1", "ba"),
    ("{{(a`1?)b}}+", "`1", "abab"),
    ("`1(a)", "`1", "aa"),
    # typed fields
    ("^%d$", "", "-2147483648"),
    ("%5d%x", "", "   42 0x1Fh"),
    ("%___d%=d%+d", "", "  12 4294967295 +1"),
    ("% d,% 4x", "", "  ,    "),
    ("%f,%v,%8.3f", "", "1.5,2.5k,  -12.50"),
    ("%s %3s % s", "", "word abc"),
    ("%0C", "<`0>", 'x"a\\"b"y'),
    ("%+C%+C", "", "'a'~b~"),
    ("%t", "", "31/12/99 29.02.2000 1-1-2057"),
    ("%d" * 19, "", "1 " * 19),
    # replacements
    ("b", "`a`b`n`101`x\\\\`", "abc"),
    ("b", "`9`0", "abc"),
    # what configuration and options match
    ("^(.*?)`s*=`s*(.*)$", "`2=`1", "name = value"),
    ("^(([A-Za-z]:)?[`w`d.`-_`\\]+)|([A-Za-z]:)$", "", "C:\\dir\\a-b_c.txt"),
    ("`s*=`s*(!)?(.*?)`s*(`.`.`.)?$", "", "host|server (main) = !S ..."),
    # no patterns
    ("(a", "", "a"),
    ("a**", "", "a"),
    ("[z-a]", "", "a"),
    ("{{" * 50, "", ""),
]


def pattern_input(pattern, replacement, subject):
    return ("7 " + "\n\n".join((pattern, replacement, subject))).encode(
        "latin-1")


def main():
    folder = os.path.join(HERE, "corpus", "patterns")
    os.makedirs(folder, exist_ok=True)
    for number, row in enumerate(PATTERNS):
        with open("%s/seed_%02d" % (folder, number), "wb") as file:
            file.write(pattern_input(*row))


if __name__ == "__main__":
    main()
