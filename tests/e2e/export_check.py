#!/usr/bin/env python3
"""Runs the export tool over random tables and compares it with the model.

    export_check.py --tool "LAUNCHER... PATH/vtx2csv" --bin-dir DIR
                    [--quick] [--seed N] [--only]

Each table goes into a folder of its own, which is the tool's working
directory. Compared are the exit code, every byte of the standard output, the
output file, and that the table itself and the temporary folder stay as they
were. `--seed` moves the first table's seed; `--only` runs that one table
(and the failing table of the same seed) alone.

Exit codes: 0 all alike, 1 a difference, 77 the tool is not there.
"""

import concurrent.futures
import os
import random
import re
import shutil
import subprocess
import sys
import tempfile
import threading
import time

sys.dont_write_bytecode = True
sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)),
                                "..", "kit"))

import checks  # noqa: E402  (only after the lines above)
import export_model as model  # noqa: E402
import export_table  # noqa: E402

TABLES, TABLES_QUICK = 3000, 150
FAILING, FAILING_QUICK = 64, 8  # each costs the tool's wait of two seconds
WORKERS_FAILING = 4
START_LOCK, START_GAP = threading.Lock(), 0.3
TIME_LIMIT = 120
OLD_CONTENT = b"the file of yesterday"
DEFAULT_NAME = "r9qvtx.csv"
OUTPUT_NAMES = (None, None, None, "out.csv", "-", "two words.txt")


class Difference(Exception):
    pass


def expect(condition, text, *values):
    if not condition:
        raise Difference(text % values)


# --------------------------------------------------------------- one run

class Run:
    """One table, and one way to call the tool on it."""

    def __init__(self, table, seed):
        rng = random.Random("run %d" % seed)
        self.table, self.seed = table, seed
        self.directory = rng.choice((None, ".", ".", "sub", "sub\\"))
        self.output = rng.choice(OUTPUT_NAMES)
        self.surplus = self.output is not None and rng.random() < 0.2
        self.has_old = rng.random() < 0.3

    @property
    def name(self):
        return self.output or DEFAULT_NAME

    def arguments(self):
        words = [] if self.directory is None else ["-r9q", self.directory]
        words += [] if self.output is None else [self.output]
        return words + (["surplus.csv"] if self.surplus else [])

    def prepare(self, folder):
        """The table, an old output file if wanted, an empty temp folder."""
        is_below = (self.directory or "").startswith("sub")
        self.table_dir = os.path.join(folder, "sub") if is_below else folder
        export_table.write_files(self.table, self.table_dir)
        self.output_path = os.path.join(folder, self.name)
        if self.has_old:
            write_bytes(self.output_path, OLD_CONTENT)
        self.temp_dir = os.path.join(folder, "temp")
        os.mkdir(self.temp_dir)


def write_bytes(path, data):
    with open(path, "wb") as file:
        file.write(data)


def read_bytes(path):
    with open(path, "rb") as file:
        return file.read()


def environment(tool, temp_dir):
    """A temporary folder for each run, so that what a failed one leaves
    behind goes with it. Not under Wine: the tool would not see it, and Wine
    starts its server anew, for seconds, in each folder so named."""
    if tool[-1].lower().endswith(".exe"):
        return None
    return dict(os.environ, TMPDIR=temp_dir)


def call_tool(tool, run, folder):
    return subprocess.run(
        tool + run.arguments(), cwd=folder, env=environment(tool, run.temp_dir),
        stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
        stderr=subprocess.PIPE, timeout=TIME_LIMIT)


# ------------------------------------------------------------ comparisons

def describe_row(rows, at):
    """(row, cell, expected text) of a byte offset of the file."""
    if at < len(model.HEADER_ROW):
        return "the header"
    at -= len(model.HEADER_ROW)
    for number, cells in enumerate(rows):
        size = len(model.row_bytes(cells))
        if at < size:
            return "row %d, %s" % (number, describe_cell(cells, at))
        at -= size
    return "behind the last of %d rows" % len(rows)


def describe_cell(cells, at):
    for number, cell in enumerate(cells):
        if at < len(cell) + 2:
            code, kind, field = model.COLUMNS[number]
            return "cell %d (%s, %s %s), expected %r" % (
                number, code, kind, field, cell)
        at -= len(cell) + 2
    return "the line end"


def first_difference(expected, got):
    for at, (left, right) in enumerate(zip(expected, got)):
        if left != right:
            return at
    return min(len(expected), len(got))


def compare_csv(outcome, got):
    expected = outcome.data
    if got == expected:
        return
    at = first_difference(expected, got)
    low = max(0, at - 30)
    raise Difference(
        "the output differs at byte %d (%d expected, %d made): %s\n"
        "  expected ...%r\n  got      ...%r" % (
            at, len(expected), len(got), describe_row(outcome.rows, at),
            expected[low:at + 50], got[low:at + 50]))


def compare_inputs(run):
    for name, data in run.table.files.items():
        now = read_bytes(os.path.join(run.table_dir, name))
        expect(now == data, "the tool changed %s", name)


def compare_success(run, done):
    told = "start converting to %s\r\ndone.\r\n" % run.name
    expect(done.returncode == 0, "exit code %d, output %r, expected 0",
           done.returncode, done.stdout[-300:])
    expect(done.stdout == told.encode(), "standard output %r, expected %r",
           done.stdout, told)
    expect(os.path.isfile(run.output_path), "no file %s", run.name)
    compare_csv(run.table.outcome, read_bytes(run.output_path))
    left = [n for n in os.listdir(run.temp_dir) if n.endswith(".csv")]
    expect(not left, "left in the temporary folder: %s", left)


def failure_pattern(run):
    """What a failed run prints, but for program path and source position."""
    outcome = run.table.outcome
    if outcome.kind == "init":
        start, words = b"", rb"ERROR INIT VTX \(%d\)" % outcome.code
    else:
        is_open = run.table.kind != "empty index"
        told = b"start converting to %s" % run.name.encode()
        start = told if is_open else b""
        words = rb"1000: bailed out: \S+ "
    return re.compile(re.escape(start) + rb"\r\n[^\r\n]* 1\.01a Fatal Error "
                      + words + rb"( |\r\n {11})\[[^\r\n]*\]\r\n", re.DOTALL)


def compare_failure(run, done):
    pattern = failure_pattern(run)
    expect(done.returncode == 100, "exit code %d, expected 100 (%s)",
           done.returncode, run.table.outcome.why)
    expect(pattern.fullmatch(done.stdout), "standard output %r, expected %r",
           done.stdout, pattern.pattern)
    if run.has_old:
        expect(read_bytes(run.output_path) == OLD_CONTENT,
               "the failed run touched the old %s", run.name)
    else:
        expect(not os.path.exists(run.output_path),
               "the failed run left %s", run.name)


def check(tool, run):
    """None, or the text of the difference."""
    folder = tempfile.mkdtemp(prefix="export_check_")
    try:
        run.prepare(folder)
        done = call_tool(tool, run, folder)
        is_csv = run.table.outcome.kind == "csv"
        (compare_success if is_csv else compare_failure)(run, done)
        compare_inputs(run)
    except Difference as difference:
        return str(difference)
    except subprocess.TimeoutExpired:
        return "no end after %d seconds" % TIME_LIMIT
    finally:
        shutil.rmtree(folder, ignore_errors=True)
    return None


# ------------------------------------------------------------- whole check

def described(run, difference):
    failing = "" if run.table.outcome.kind == "csv" else " --failing"
    return ("seed %d (%s), arguments %s: %s\n"
            "  the table: export_table.py make DIR --seed %d%s" % (
                run.seed, run.table.kind, run.arguments(), difference,
                run.seed, failing))


def seeds_of(arguments):
    """(seeds of exporting tables, seeds of failing tables)."""
    first = arguments.seed
    if arguments.only:
        return [first], [first]
    if arguments.quick:
        return (range(first, first + TABLES_QUICK),
                range(first, first + FAILING_QUICK))
    return range(first, first + TABLES), range(first, first + FAILING)


def check_exports(tool, seeds):
    """Number of rows compared; Difference at the first one."""
    rows = 0
    for seed in seeds:
        run = Run(export_table.build(seed), seed)
        stop_on(run, check(tool, run))
        rows += len(run.table.outcome.rows)
    return rows


def check_failing(tool, seeds):
    """Side by side, as each waits before it ends. Their starts keep apart:
    two runs of the same millisecond would choose the same temporary name."""
    runs = [Run(export_table.build_failing(seed), seed) for seed in seeds]
    pool = concurrent.futures.ThreadPoolExecutor(WORKERS_FAILING)
    waiting = [pool.submit(check_apart, tool, run) for run in runs]
    try:
        for run, result in zip(runs, waiting):
            stop_on(run, result.result())
    finally:
        pool.shutdown(cancel_futures=True)


def check_apart(tool, run):
    with START_LOCK:
        time.sleep(START_GAP)
    return check(tool, run)


def stop_on(run, difference):
    if difference is not None:
        raise Difference(described(run, difference))


def main():
    arguments = checks.parse_arguments("Compares the export tool with its model.")
    tool = checks.resolved_tool(arguments, "vtx2csv")
    if tool is None:
        return checks.SKIPPED
    if not model.self_test():
        print("the model fails its self test")
        return 1
    good, bad = seeds_of(arguments)
    try:
        rows = check_exports(tool, good)
        check_failing(tool, bad)
    except Difference as difference:
        print(difference)
        return 1
    print("export_check: %d tables with %d rows and %d failing tables alike"
          % (len(good), rows, len(bad)))
    return 0


if __name__ == "__main__":
    sys.exit(main())
