"""Patterns beside the engines that others would take.

The program is bench/patterns.cpp and its patterns_*.cpp, which hold the
patterns, their subjects and the sides. Before anything is measured, the
results of all sides are compared: where a match and its groups stand, and
what a replacement makes.

The goals are ratios to PCRE2's interpreter. A mean is the geometric mean of
the figures of the rows that it names; those that the peer can't run are left
out on both sides, and its number is that of the rest.
"""

import statistics

import kit

REPETITIONS = 9


PCRE2_PACKAGE = {"libpcre2-dev": "/usr/include/pcre2.h"}
RE2_PACKAGE = {"libre2-dev": "/usr/include/re2/re2.h"}
BOOST_PACKAGE = {"libboost-regex-dev": "/usr/include/boost/regex.hpp"}
PACKAGES = {**kit.GoogleBenchmark.PACKAGES, **PCRE2_PACKAGE, **RE2_PACKAGE,
            **BOOST_PACKAGE}

PCRE2 = kit.Peer("pcre2", "PCRE2", PCRE2_PACKAGE)
RE2 = kit.Peer("re2", "RE2", RE2_PACKAGE)
OTHERS = [
    kit.Peer("jit", "PCRE2, just in time", PCRE2_PACKAGE),
    RE2,
    kit.Peer("std", "std::regex", cannot=("loop", "to_last")),
    kit.Peer("boost", "Boost.Regex", BOOST_PACKAGE, cannot=("ambiguous",)),
]
PEERS = [PCRE2] + OTHERS

SHORT = ["option", "option_type", "option_value", "section", "item",
         "declaration", "in_parentheses", "path", "level", "log_line",
         "number", "name", "quoted"]
LONG = ["needle", "trim", "class_run", "words", "loop"]
REPLACING = ["squeeze", "swap"]
PATHOLOGICAL = [("ambiguous", "^(a|aa)+$ on 24 a and a b"),
                ("three_stars", "^(.*)(.*)(.*)`d on 60 bytes")]

MICRO = 1000.0  # nanoseconds


class Figures:
    """Nanoseconds of all sides; each benchmark's are measured when they are
    first asked for, all sides in one process."""

    def __init__(self, program):
        self.program = program
        self.known = {}

    def of(self, what, side):
        """None if it was left out."""
        if not kit.is_wanted(what):
            return None
        if what not in self.known:
            self.known[what] = self.measure(what)
        return self.known[what][side]

    def measure(self, what):
        sides = ["ours"] + [peer.side for peer in PEERS
                            if not peer.missing() and what not in peer.cannot]
        if what in SHORT:
            sides.append("string")
        names = {side: "%s/%s" % (what, side) for side in sides}
        found = self.program.measure(list(names.values()), what)
        return {side: found[name] for side, name in names.items()}


def compared(figures, name, benchmarks, peer, firm=None, aim=None,
             unit=1.0, side="ours"):
    """The row of the geometric means of `benchmarks`. "#" in the name is how
    many they are."""
    able = [what for what in benchmarks if what not in peer.cannot]
    name = name.replace("#", str(len(able)))
    if peer.missing():
        return kit.skipped(name, peer.name, peer.missing(), firm, aim)
    if not able:
        return kit.Row(name, None, peer.name, "can't", None, firm, aim)
    ours = [figures.of(what, side) for what in able]
    if None in ours:
        return kit.Row(name, None, peer.name, "left out", None, firm, aim)
    ours = statistics.geometric_mean(ours)
    theirs = statistics.geometric_mean(
        [figures.of(what, peer.side) for what in able])
    return kit.Row(name, ours / unit, peer.name, theirs / unit, ours / theirs,
                   firm, aim)


# ------------------------------------------------------------------- rows

def short_rows(figures):
    for what in SHORT:
        yield compared(figures, "short: %s, ns" % what.replace("_", " "),
                       [what], PCRE2)
    mean = "short: mean of #, ns"
    yield compared(figures, mean, SHORT, PCRE2, 0.45, 0.22)
    for peer in OTHERS:
        yield compared(figures, mean, SHORT, peer)
    yield compared(figures, "short: mean of #, strings and a literal, ns",
                   SHORT, PCRE2, side="string")


def long_rows(figures):
    for what in LONG + ["to_last"]:
        yield compared(figures, "1 MB: %s, us" % what.replace("_", " "),
                       [what], PCRE2, unit=MICRO)
    mean = "1 MB: mean of # (without to last), us"
    yield compared(figures, mean, LONG, PCRE2, 0.65, 0.2, MICRO)
    for peer in OTHERS:
        yield compared(figures, mean, LONG, peer, unit=MICRO)


def replacing_rows(figures):
    for what in REPLACING:
        yield compared(figures, "replace all in 1 MB: %s, us" % what, [what],
                       PCRE2, unit=MICRO)
    mean = "replace all in 1 MB: mean of #, us"
    yield compared(figures, mean, REPLACING, PCRE2, 0.5, 0.25, MICRO)
    for peer in OTHERS:
        yield compared(figures, mean, REPLACING, peer, unit=MICRO)


def compile_rows(figures):
    name = "compile: each of %d, ns" % len(SHORT)
    yield compared(figures, name, ["compile"], PCRE2, 2.0, 1.0)
    for peer in OTHERS:
        yield compared(figures, name, ["compile"], peer)


def pathological_rows(figures):
    for what, shown in PATHOLOGICAL:
        name = shown + ", us"
        yield compared(figures, name, [what], PCRE2, 1.0, unit=MICRO)
        for peer in OTHERS:
            aim = 3.0 if peer is RE2 else None
            yield compared(figures, name, [what], peer, None, aim, MICRO)


def rows(bench):
    for package, file in kit.GoogleBenchmark.PACKAGES.items():
        if not kit.is_there(file):
            return [kit.skipped("patterns", "all", package)]
    program = kit.GoogleBenchmark("bench_patterns", bench,
                                  bench.rounds(REPETITIONS))
    program.check()
    figures = Figures(program)
    return [row for group in (short_rows, long_rows, replacing_rows,
                              compile_rows, pathological_rows)
            for row in group(figures)]
