"""Composing and reading of text: the format language, Hebrew lines and numbers
beside what others take for that.

The program is bench/text.cpp and its text_*.cpp, which say what one operation
is. All figures are nanoseconds per operation; each makes its result anew, as
a string of its side where it is text. Before anything is measured the results
of all sides are compared; where two may differ, the sources say so.
"""

from dataclasses import dataclass, field

import kit

REPETITIONS = 9


FMT_PACKAGE = {"libfmt-dev": "/usr/include/fmt/format.h"}
FRIBIDI_PACKAGE = {"libfribidi-dev": "/usr/include/fribidi/fribidi.h"}
PACKAGES = {**kit.GoogleBenchmark.PACKAGES, **FMT_PACKAGE, **FRIBIDI_PACKAGE}

FMT = kit.Peer("fmt", "{fmt}, {}", FMT_PACKAGE)
FMT_15 = kit.Peer("fmt15", "{fmt}, {:.15g}", FMT_PACKAGE)
FMT_FIXED = kit.Peer("fmt", "{fmt}, {:.2f}", FMT_PACKAGE)
FMT_THOUSANDS = kit.Peer("fmt", "{fmt}, {:.2Lf}", FMT_PACKAGE)
SNPRINTF = kit.Peer("snprintf", "snprintf")
STREAM = kit.Peer("stream", "std::ostringstream")
TO_CHARS_15 = kit.Peer("to_chars", "std::to_chars, 15")
TO_CHARS = kit.Peer("to_chars", "std::to_chars")
FRIBIDI = kit.Peer("fribidi", "FriBidi", FRIBIDI_PACKAGE)
LOG2VIS = kit.Peer("log2vis", "FriBidi, log2vis", FRIBIDI_PACKAGE)
ICONV = kit.Peer("iconv", "iconv")
FROM_CHARS = kit.Peer("from_chars", "std::from_chars")
STRTOL = kit.Peer("strtol", "strtol")
STRTOD = kit.Peer("strtod", "strtod")


@dataclass
class Line:
    """A row of each peer; a goal belongs to one of them."""

    name: str
    what: str
    peers: list
    goals: dict = field(default_factory=dict)  # {peer's side: (firm, aim)}
    side: str = "ours"


LINES = [
    Line('"# # #" of text, int, text', "text_int_text",
         [FMT, SNPRINTF, STREAM], {"fmt": (0.9, 0.5)}),
    Line('"#" of a text', "one_text",
         [FMT, SNPRINTF, STREAM], {"fmt": (0.9, 0.5)}),
    Line('"# # #" of int, text, double', "int_text_double",
         [FMT, FMT_15, SNPRINTF, STREAM],
         {"fmt": (0.4, 0.2), "fmt15": (0.4, 0.2)}),
    Line('"#" of a double with up to 4 decimals', "double",
         [TO_CHARS_15, FMT, SNPRINTF, STREAM], {"to_chars": (0.5, 0.3)}),
    Line("the same into a string that is kept", "double_kept", [TO_CHARS_15],
         {"to_chars": (0.5, 0.3)}),
    Line('"%.2f"', "fixed", [FMT_FIXED, SNPRINTF, TO_CHARS]),
    Line('"%.2[,]v"', "picture", [FMT_THOUSANDS]),
    Line("Hebrew line, the road of exports", "hebrew",
         [FRIBIDI, LOG2VIS, ICONV],
         {"fribidi": (0.1, 0.045), "iconv": (1.0, 0.5)}),
    Line("Hebrew line, the two conversions", "hebrew", [FRIBIDI, ICONV],
         {"fribidi": (0.1, 0.045), "iconv": (1.0, 0.5)}, side="two"),
    Line("dos_to_utf16 of a line", "utf16", [ICONV]),
    Line("parse_long", "parse_long", [FROM_CHARS, STRTOL],
         {"from_chars": (2.0, 1.2)}),
    Line("parse_long, commas and blanks", "parse_long", [FROM_CHARS],
         side="written"),
    Line("parse_double", "parse_double", [FROM_CHARS, STRTOD],
         {"from_chars": (2.0, 1.2)}),
    Line("parse_double, commas and blanks", "parse_double", [FROM_CHARS],
         side="written"),
]


class Figures:
    """Nanoseconds of all sides; each benchmark's are measured when they are
    first asked for, all sides in one process."""

    def __init__(self, program):
        self.program = program
        self.known = {}

    def of(self, what):
        if what not in self.known:
            names = {side: "%s/%s" % (what, side) for side in sides_of(what)}
            found = self.program.measure(list(names.values()), what)
            self.known[what] = {side: found[name]
                                for side, name in names.items()}
        return self.known[what]


def sides_of(what):
    sides = {}  # in order, each once
    for line in LINES:
        if line.what == what:
            sides.update(dict.fromkeys(
                [line.side] + [peer.side for peer in line.peers
                               if not peer.missing()]))
    return list(sides)


def rows_of(line, figures):
    for peer in line.peers:
        name = line.name + ", ns"
        goals = line.goals.get(peer.side, (None, None))
        if peer.missing():
            yield kit.skipped(name, peer.name, peer.missing(), *goals)
        elif not kit.is_wanted(line.what):
            yield kit.Row(name, None, peer.name, "left out", None, *goals)
        else:
            found = figures.of(line.what)
            ours, theirs = found[line.side], found[peer.side]
            yield kit.Row(name, ours, peer.name, theirs, ours / theirs, *goals)


def rows(bench):
    for package, file in kit.GoogleBenchmark.PACKAGES.items():
        if not kit.is_there(file):
            return [kit.skipped("text", "all", package)]
    program = kit.GoogleBenchmark("bench_text", bench,
                                  bench.rounds(REPETITIONS))
    program.check()
    figures = Figures(program)
    return [row for line in LINES for row in rows_of(line, figures)]
