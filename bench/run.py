#!/usr/bin/env python3
"""Runs benchmarks and prints how ours stand to their peers and goals.

    bench/run.py [GROUP...] [--rounds N]    without a group: all that exist
    bench/run.py --missing [GROUP...]       names the packages to install

A group is a module of bench/groups; what it gives is said in bench/kit.py.
Each group's table is printed and written to build/bench/GROUP.tsv. Goals are
printed beside the figures and never fail a run; a wrong output does.

`./dev bench` builds what is measured and calls this.
"""

import argparse
import datetime
import importlib
import os
import sys

sys.dont_write_bytecode = True

import kit  # noqa: E402  (only after the line above)

HERE = os.path.dirname(os.path.abspath(__file__))
COLUMNS = ("row", "ours", "peer", "peer's figure", "ratio", "firm goal", "aim")
LEGEND = "ratio: ours / peer; !! beyond the firm goal, ! beyond the aim"


# ------------------------------------------------------------------ table

def figure(value):
    """Three digits that count; what isn't a number as it is."""
    if value is None:
        return "-"
    if isinstance(value, str):
        return value
    places = 3 if abs(value) < 10 else 1
    return "%.*f" % (places, value)


def goal(value):
    if value is None:
        return "-"
    text = "%.3f" % value
    return text[:-1] if text.endswith("0") else text


def cells(row):
    return [row.name, figure(row.ours), row.peer, figure(row.figure),
            figure(row.ratio), goal(row.firm), goal(row.aim)]


def mark(row):
    if row.ratio is None:
        return ""
    if row.firm is not None and row.ratio > row.firm:
        return "!!"
    return "!" if row.aim is not None and row.ratio > row.aim else ""


def print_table(rows):
    lines = [list(COLUMNS) + [""]]
    lines += [cells(row) + [mark(row)] for row in rows]
    widths = [max(map(len, column)) for column in zip(*lines)]
    for line in lines:
        print("  ".join(map(str.ljust, line, widths)).rstrip())
    print(LEGEND)


def write_tsv(path, rows):
    with open(path, "w", encoding="utf-8") as file:
        for line in [COLUMNS] + [cells(row) for row in rows]:
            file.write("\t".join(line) + "\n")


# ----------------------------------------------------------------- groups

def group_names():
    names = sorted(os.listdir(os.path.join(HERE, "groups")))
    return [name[:-3] for name in names if name.endswith(".py")]


def load(name):
    return importlib.import_module("groups." + name)


def run_group(name, rounds):
    bench = kit.Bench(name, rounds)
    print("=== %s: %s, load %s" % (
        name, datetime.datetime.now().strftime("%Y-%m-%d %H:%M"), load_now()))
    rows = load(name).rows(bench)
    print_table(rows)
    for note in bench.notes:
        print(note)
    path = os.path.join(kit.OUTPUT, name + ".tsv")
    write_tsv(path, rows)
    print("load %s; written to %s" % (load_now(), path))


def load_now():
    """Figures of a busy machine are worth little, so they come with this."""
    return "%.2f" % os.getloadavg()[0]


def missing_packages(names):
    wanted = set()
    for name in names:
        wanted.update(p for p, what in load(name).PACKAGES.items()
                      if not kit.is_there(what))
    return sorted(wanted)


# ----------------------------------------------------------- command line

def positive(text):
    value = int(text)
    if value < 1:
        raise ValueError
    return value


def parse_arguments():
    parser = argparse.ArgumentParser(
        description="Runs benchmarks beside their peers.")
    parser.add_argument("groups", nargs="*", metavar="GROUP")
    parser.add_argument("--rounds", type=positive, metavar="N",
                        help="measured rounds, otherwise the group's own")
    parser.add_argument("--missing", action="store_true",
                        help="only name the packages that are not installed")
    arguments = parser.parse_args()
    for name in arguments.groups:
        if name not in group_names():
            parser.error("no group of benchmarks is called %s; there are: %s"
                         % (name, " ".join(group_names())))
    return arguments


def main():
    arguments = parse_arguments()
    names = arguments.groups or group_names()
    os.chdir(os.path.dirname(HERE))
    if arguments.missing:
        print(" ".join(missing_packages(names)))
        return 0
    try:
        for name in names:
            run_group(name, arguments.rounds)
    except kit.Failure as failure:
        print("bench: %s" % failure, file=sys.stderr)
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main())
