#!/usr/bin/env python3
"""Writes the seeds of the fuzz targets, fuzz/corpus/TARGET/seed_*: inputs
that were thought up, from which the fuzzer goes on. Its finds stand beside
them, under names of its own.

    fuzz/seeds.py
"""

import os
import struct

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


# Formats with their arguments, which are a kind and a value: an int, or the
# index of a text or double in fuzz/formats.cpp.
FORMATS = [
    # plain text, doubled marks, line feeds
    ("", []),
    ("abc\ndef\n", []),
    ("## %% $$", []),
    ("100%", []),
    # each kind under # and under directives that take it, and one too few
    ("# # # # #", [("i", 7), ("l", -7), ("v", 8), ("u", 9), ("c", 65)]),
    ("#, #, #, #", [("z", 2), ("s", 6), ("1", 10), ("b", 200)]),
    ("# # # #", [("t", 14000), ("M", 1234567890), ("m", 411522630),
                 ("k", 3)]),
    ("# # # #", [("p", 0x12FF7C), ("B", 1), ("f", 3), ("m", 0)]),
    ("# # #", [("f", 11), ("f", 12)]),
    ("%d %5u %-6i| %x %+X %05o", [("i", 7), ("u", 8), ("l", -9), ("v", 255),
                                  ("b", 171), ("B", 1)]),
    ("%c%3c%-3c|", [("c", 0), ("b", 65), ("i", 66)]),
    ("%e %.3E %f %.0f %g %#G", [("f", 3), ("f", 6), ("f", 5), ("f", 4),
                                ("f", 12), ("f", 8)]),
    ("%.15g %014.3e %+.50f", [("f", 7), ("f", 8), ("f", 17)]),
    ("%p|%20p", [("p", 1), ("p", 2)]),
    ("%10.3s|%#.3s|%-5s|%#-9.2s|%z", [("z", 2), ("s", 6), ("s", 1),
                                      ("z", 10), ("z", 1)]),
    ("%h %20h", [("s", 2), ("z", 10)]),
    ("%L|%.1L|%20.2L", [("k", 3), ("k", 6), ("k", 2)]),
    ("%T|%.3T|%20.5T|%-20T|", [("M", 1234567890), ("m", 411522630), ("m", 0),
                               ("M", 86400)]),
    ("%.6T", [("m", 0)]),
    ("%t|%12t|%[%y%m%d-%H%M%S]t|%20[%a %b]t", [
        ("t", 14000), ("M", 1234567890), ("m", 411522630), ("t", 1)]),
    ("%<%>%<", [("i", 1), ("z", 2), ("k", 3)]),
    # widths from arguments
    ("%*d|%-*.*f|", [("i", 9), ("i", 5), ("i", 20), ("i", 2), ("f", 3)]),
    ("a%*d rest", [("u", 9), ("i", 5)]),
    ("a%.*s rest", []),
    # pictures
    ("%v %[,]v %5[]v %5[~]v", [("f", 3), ("f", 8), ("f", 8), ("f", 8)]),
    ("%[k]v %[m]v %[Kk]v %[p]v", [("f", 9), ("f", 10), ("f", 9), ("f", 2)]),
    ("%.4[0]v %.4[i]v %.1[f]v %.1[r]v", [("f", 3), ("f", 3), ("f", 7),
                                         ("f", 7)]),
    ("%.1[+]v %.1[a]v %[d]v %4[b]v", [("f", 3), ("f", 7), ("f", 6),
                                      ("f", 0)]),
    ("%39[,~kmpdfrs+K]v", [("f", 14)]),
    ("%40[]v", [("i", 7)]),
    ("%v %v %v %v", [("f", 21), ("f", 22), ("f", 23), ("f", 15)]),
    ("%[b]v %[i]v %[?]v", [("b", 0), ("c", 200), ("i", 1)]),
    # too long, or never closed
    ("%" + " +-#" * 8 + "5d", [("i", 1)]),
    ("%[12345678901234567890]v", [("i", 1)]),
    ("%[%y", [("m", 1)]),
    ("%300d", [("i", 1)]),
    ("%.255f|%.256f", [("f", 3), ("f", 3)]),
    # escapes
    ("$0|$1|$2|$`|$'", []),
    ("$T $d $t $M$%*|${0}|$%-%|$%1%|${2}|$%9", []),
    ("${path}|$%PATH%|${}|$%no_such", []),
    ("${a}|${abc}|$%err%", [("3", 131), ("3", 130)]),
    ("a${b}", [("3", 128), ("i", 1)]),
    ("abcdefghijkl$c10|$s20|$s|$c|", []),
    ("$r-20|$rab3$r+", []),
    ("$r.9999$s9999$c0", []),
    ("a$q#", [("i", 1)]),
    # words that blank the line, wrong types
    ("a %s b", [("z", 3)]),
    ("a %d b %s", [("z", 4), ("s", 3)]),
    ("%d %s", [("s", 2), ("i", 1)]),
    ("%f %d", [("i", 1), ("f", 1)]),
    ("#", [("0", None)]),
    ("# %d", [("?", 7)]),
    # left-over arguments
    ("#", [("i", 1), ("i", 2)]),
    # into itself
    ("abc # %s #", [("O", 1), ("O", 0), ("o", 2)]),
    ("$r-99%s", [("O", 3)]),
]
# Indexes of those whose arguments are a list.
LISTS = [("# #", [("i", 1), ("z", 2)]), ("#", [("i", 1), ("i", 2)]),
         ("#", []), ("# %s %d", [("0", None), ("z", 3), ("B", 1)])]

KINDS = "ilvuczsf1tMmk3pbB0FOo?"


def argument(kind, value):
    if kind in "zsf1k3Oo?":
        data = struct.pack("<B", value)
    elif kind in "tMm":
        data = struct.pack("<I", value)
    elif kind == "p":
        data = struct.pack("<Q", value)
    elif kind == "0":
        data = b""
    else:
        data = struct.pack("<h", value)
    return struct.pack("<B", KINDS.index(kind)) + data


def format_input(text, arguments, flags=0):
    return (struct.pack("<B", flags | len(arguments))
            + b"".join(argument(*one) for one in arguments)
            + text.encode("latin-1"))


def letters(text):
    """Hebrew letters of code page 862 for capitals, marks for < and >."""
    return bytes({"<": 253, ">": 254}.get(c, ord(c) + 63 if c.isupper()
                                          else ord(c)) for c in text)


LINES = [
    "", "CBA", "abc", "abc.", ".DCBA abc (12.5%) FE", "C 12,345.67 A", "$12 A",
    "A$12", "12$ A", "C5%$A", "C1$$2A", "50%", "(A", "E[B}A", "12 abc",
    "A abc 12", "abc 12 A", "A<abc", "abc>A", "1>2A", "$>5A", "<", ">", "<<>>",
    "a> b", "A <5", "12/05/08 10:30", "A\r\n12 abc\r\n\r\n.B", "\r\n", "A\r",
    "C1%2A", "1,,2", "\0A\0", "AB\xe0\xe1\xfb\xfc\xff ab", "DC ab BA xy",
]

# What is looked for, and the text.
STRINGS = [
    ("", ""), ("b", "abcabc"), ("bc", "abcabc"), ("bca", "xbcabca"),
    ("", "  12,345k "), ("", "2147483648"), ("", "99999999999"),
    ("", "2147484k"), ("", "-5m"), ("", "2147482K"), ("", "12,"),
    ("", ",12"), ("", "1,000.5"), ("", "2k"), ("", "1.5g"), ("", "1e5"),
    ("", "1e"), ("", "1e+"), ("", "-123.456e-10"), ("", "1e400"),
    ("", "1e-400"), ("", "9007199254740993"), ("", "0.1000000000000000055"),
    ("", "123456789012345678901234567890.5e-20"), ("", "0x1Fh"),
    ("", "FFFFFFFF"), ("", "1G"), ("\\", "\\0\\a\\b\\t\\n\\f\\r\\x41"),
    ("q", "\\q\\x1h\\x\\"), ("\0", "a\0b\1\x0b\"'~\\"), ("AB", "xabAb\0c"),
    ("\xe0", "\xe0\xe1\xff\x80"), ("aab", "aaaaaaab"),
]


def string_input(what, text):
    data = what.encode("latin-1")
    return struct.pack("<B", len(data)) + data + text.encode("latin-1")


SEEDS = {
    "patterns": [pattern_input(*row) for row in PATTERNS],
    "formats": [format_input(*row) for row in FORMATS]
               + [format_input(*row, flags=16) for row in LISTS],
    "hebrew": [letters(line) for line in LINES],
    "unescape": [string_input(*row) for row in STRINGS],
}


def main():
    for target, inputs in SEEDS.items():
        folder = os.path.join(HERE, "corpus", target)
        os.makedirs(folder, exist_ok=True)
        for number, data in enumerate(inputs):
            with open("%s/seed_%02d" % (folder, number), "wb") as file:
                file.write(data)


if __name__ == "__main__":
    main()
