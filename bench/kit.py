"""What the groups of benchmarks share: rows, packages, rounds of processes.

A group is a module with

    PACKAGES        {Debian package: what it brings, as in is_there()}
    rows(bench)     measures, and returns a list of Row

Whole processes are measured like this:

    ours = Process("ours", ["build/native/bin/tool", "in", "out"])
    peer = Process("peer", ["build/bench/x/peer", "in", "out"], rounds=3)
    run_rounds([ours, peer], 9, check)
    row = compared("tool, s", ours, peer, firm=0.3)

All paths are relative to the project's root, which is the current folder.
"""

import os
import shutil
import statistics
import subprocess
import time
from dataclasses import dataclass

OUTPUT = "build/bench"
PROGRAMS = "build/native/bin"


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
