"""What the groups of benchmarks share: rows, packages, rounds of processes.

A group is a module with

    PACKAGES        {Debian package: what it brings, as in is_there()}
    rows(bench)     measures, and returns a list of Row

Whole processes are measured like this:

    ours = Process("ours", ["build/native/bin/tool", "in", "out"])
    peer = Process("peer", ["build/bench/x/peer", "in", "out"], rounds=3)
    run_rounds([ours, peer], 9, check)
    row = compared("tool, s", ours, peer, firm=0.3)

Functions are measured by a program with Google Benchmark, whose benchmarks
are named WHAT/SIDE or WHAT/SIDE/SIZE, SIDE being "ours" or "peer":

    program = GoogleBenchmark("bench_x", bench, 9)
    row = program.compared("copy of 30 bytes, ns", "copy/30", "std::string",
                           firm=0.2)

All paths are relative to the project's root, which is the current folder.
"""

import json
import os
import re
import shutil
import statistics
import subprocess
import time
from dataclasses import dataclass, field

OUTPUT = "build/bench"
PROGRAMS = "build/native/bin"
BENCH_PROGRAMS = "build/bench-native/bin"


class Failure(Exception):
    """What ends the benchmarks: a program that fails or writes wrong bytes."""


@dataclass
class Row:
    """A line of the table. `ratio`, `firm` and `aim` are ours / peer's;
    None where there is none."""

    name: str                     # with the unit of the figures
    ours: float | None
    peer: str
    figure: float | str | None    # the peer's, or why there is none
    ratio: float | None = None
    firm: float | None = None
    aim: float | None = None


class Bench:
    """What a group is given: its own folder and the wish for rounds."""

    def __init__(self, group, rounds):
        self.folder = os.path.join(OUTPUT, group)
        self.notes = []  # printed below the table
        self._rounds = rounds
        os.makedirs(self.folder, exist_ok=True)

    def rounds(self, usual):
        return self._rounds or usual


# --------------------------------------------------------------- packages

def is_there(what):
    """A program, or if there is a slash in it the name of a file."""
    return os.path.exists(what) if "/" in what else bool(shutil.which(what))


def skipped(name, peer, package, firm=None, aim=None):
    reason = ("skipped: %s is not installed (./dev bench --install)" % package)
    return Row(name, None, peer, reason, None, firm, aim)


# -------------------------------------------------------------- processes

class Process:
    """A command and the seconds that each of its rounds took.

    `rounds` is for slow ones: they take part in the first so many only."""

    def __init__(self, name, command, rounds=None, environment=None):
        self.name, self.command, self.rounds = name, command, rounds
        self.environment = environment
        self.seconds = []

    def run(self):
        """Seconds from the start of the process to its end."""
        quiet = [(os.POSIX_SPAWN_OPEN, 1, os.devnull, os.O_WRONLY, 0)]
        start = time.perf_counter()
        pid = os.posix_spawnp(self.command[0], self.command, self.variables(),
                              file_actions=quiet)
        _, status = os.waitpid(pid, 0)
        seconds = time.perf_counter() - start
        if status != 0:
            raise Failure("%s failed: exit code %d of %s" % (
                self.name, os.waitstatus_to_exitcode(status),
                " ".join(self.command)))
        return seconds

    def variables(self):
        return dict(os.environ, **(self.environment or {}))


def run_rounds(processes, rounds, prepare=None, check=None):
    """A warm-up round, then measured ones: A B C A B C ..., so that what
    slows the machine for a while slows them all. `prepare(process)` is called
    before each run and `check(process)` after it, unmeasured."""
    for number in range(rounds + 1):
        for process in processes:
            if process.rounds is not None and number > process.rounds:
                continue
            if prepare:
                prepare(process)
            seconds = process.run()
            if check:
                check(process)
            if number > 0:
                process.seconds.append(seconds)


def compared(name, ours, peer, firm=None, aim=None):
    """The row of two processes of the same rounds. The ratio is taken in
    each round, which leaves out what changes from round to round."""
    ratios = [a / b for a, b in zip(ours.seconds, peer.seconds)]
    return Row(name, statistics.median(ours.seconds), peer.name,
               statistics.median(peer.seconds), statistics.median(ratios),
               firm, aim)


def peak_mib(process, folder):
    """The most memory that the process holds at any time of one more run."""
    launcher = folder + "/peak"
    compile_c("bench/peak.c", launcher)
    done = subprocess.run([launcher] + process.command, check=False, text=True,
                          stdout=subprocess.PIPE, env=process.variables())
    if done.returncode != 0:
        raise Failure("%s failed" % process.name)
    return int(done.stdout.splitlines()[-1]) / 1024


def compile_c(source, program):
    """As anybody would, with the system's compiler, if the source is newer.
    REQUIRES: is_there("cc")."""
    if os.path.exists(program) and (os.path.getmtime(program)
                                    > os.path.getmtime(source)):
        return
    done = subprocess.run(["cc", "-O2", "-o", program, source], check=False)
    if done.returncode != 0:
        raise Failure("%s does not compile" % source)


# -------------------------------------------------------------- functions

# If set, only those rows are measured in whose WHAT or WHAT/SIZE this pattern
# is found; with a minus ahead of it, only those in which it isn't.
FILTER_VARIABLE = "BENCH_FILTER"

NANOSECONDS = {"ns": 1.0, "us": 1e3, "ms": 1e6, "s": 1e9}


@dataclass
class Peer:
    """Another side of the benchmarks of a program that has several."""

    side: str                 # as benchmarks are named: WHAT/side
    name: str
    packages: dict = field(default_factory=dict)
    cannot: tuple = ()        # the benchmarks that it has not

    def missing(self):
        """The first package that is not there; None if all are."""
        for package, file in self.packages.items():
            if not is_there(file):
                return package
        return None


class GoogleBenchmark:
    """A program with the benchmarks of both sides of its rows.

    Each row has a process of its own: how the heap gets large blocks from
    the system, and when it gives them back, hangs on what was freed before.
    In it the repetitions of both sides come in random order, so that what
    slows the machine for a while does not meet one side alone."""

    PACKAGES = {"libbenchmark-dev": "/usr/include/benchmark/benchmark.h"}

    def __init__(self, name, bench, repetitions, seconds=0.1):
        self.path = BENCH_PROGRAMS + "/" + name
        self.folder = bench.folder
        self.repetitions, self.seconds = repetitions, seconds
        bench.notes.append(
            "medians of the processor time of %d repetitions of %g s or more"
            % (repetitions, seconds))

    def check(self):
        """Has the program compare what its sides give; raises Failure if they
        differ."""
        done = subprocess.run([self.path, "--check"], check=False, text=True,
                              errors="replace", stdout=subprocess.PIPE,
                              stderr=subprocess.STDOUT)
        if done.returncode != 0:
            raise Failure("the sides of %s differ\n%s" % (
                self.path, done.stdout))

    def compared(self, name, what, peer, firm=None, aim=None, needs=None):
        """The row of the benchmarks WHAT/ours and WHAT/peer, or for a `what`
        with a size in it of WHAT/ours/SIZE and WHAT/peer/SIZE. `needs` are
        the peer's packages, as PACKAGES of a group: without them the row is
        skipped."""
        for package, file in {**self.PACKAGES, **(needs or {})}.items():
            if not is_there(file):
                return skipped(name, peer, package, firm, aim)
        if not is_wanted(what):
            return Row(name, None, peer, "left out", None, firm, aim)
        sides = [with_side(what, side) for side in ("ours", "peer")]
        figures = self.measure(sides, what.replace("/", "_"))
        ours, theirs = [figures[side] for side in sides]
        return Row(name, ours, peer, theirs, ours / theirs, firm, aim)

    def measure(self, names, file_name):
        """{name: nanoseconds per operation}"""
        if not is_there(self.path):
            raise Failure("%s is not there; ./dev bench builds it" % self.path)
        output = "%s/%s.json" % (self.folder, file_name)
        done = subprocess.run(self.command(names, output), check=False,
                              text=True, stdout=subprocess.PIPE,
                              stderr=subprocess.STDOUT)
        if done.returncode != 0:
            raise Failure("%s failed: exit code %d\n%s" % (
                self.path, done.returncode, done.stdout))
        figures = medians(runs_of(output))
        for name in names:
            if name not in figures:
                raise Failure("%s has no benchmark %s" % (self.path, name))
        return figures

    def command(self, names, output):
        return [self.path,
                "--benchmark_filter=^(%s)(/iterations:[0-9]+)?$"
                % "|".join(names),
                "--benchmark_repetitions=%d" % self.repetitions,
                "--benchmark_min_time=%g" % self.seconds,
                "--benchmark_enable_random_interleaving=true",
                "--benchmark_out_format=json",
                "--benchmark_out=" + output]


def is_wanted(what):
    pattern = os.environ.get(FILTER_VARIABLE, "")
    if pattern.startswith("-"):
        return not re.search(pattern[1:], what)
    return bool(re.search(pattern, what))


def with_side(what, side):
    stem, slash, size = what.partition("/")
    return stem + "/" + side + slash + size


def runs_of(report):
    """An empty list if no benchmark ran: then the report is an empty file."""
    with open(report, encoding="utf-8") as file:
        text = file.read()
    return json.loads(text)["benchmarks"] if text else []


def medians(runs):
    """{benchmark: nanoseconds per operation}, of a report's repetitions."""
    figures = {}
    for run in runs:
        if run.get("error_occurred"):
            raise Failure("%s: %s" % (run["name"], run["error_message"]))
        if run["run_type"] == "iteration":
            name = run["run_name"].partition("/iterations:")[0]
            time = run["cpu_time"] * NANOSECONDS[run["time_unit"]]
            figures.setdefault(name, []).append(
                time / run.get("operations", 1))
    return {name: statistics.median(times) for name, times in figures.items()}
