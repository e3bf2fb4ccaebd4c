"""The export of the largest possible table, as whole processes.

32767 records, made once by tests/e2e/export_table.py. Whatever exports it,
its output is compared byte for byte with what the model of the tests makes
of the same table.
"""

import filecmp
import os
import shutil
import subprocess
import sys

import kit

PACKAGES = {"gcc": "cc"}

TABLE = kit.OUTPUT + "/table"
EXPECTED = TABLE + "/expected.csv"
INPUT = [TABLE + "/D4WVTX.IDX", TABLE + "/D4WVTX.BIN"]
MAKER = "tests/e2e/export_table.py"
MAKER_SOURCES = [MAKER, "tests/e2e/export_model.py"]

ROUNDS, SCRIPT_ROUNDS = 9, 3
MEMORY_BOUND = 64  # MiB

# As much as anything can do that reads the table and writes the file.
TWO_CATS = 'cat "$1" "$2" >/dev/null && cat "$3" >"$4"'


def make_table():
    """Made aside, so that an interrupted run leaves no half of one."""
    newest = max(map(os.path.getmtime, MAKER_SOURCES))
    if os.path.exists(EXPECTED) and os.path.getmtime(EXPECTED) > newest:
        return
    print("bench: making the table of 32767 records", flush=True)
    aside = TABLE + ".new"
    done = subprocess.run([sys.executable, MAKER, "full", aside, "--csv"],
                          stdout=subprocess.DEVNULL, check=False)
    if done.returncode != 0:
        raise kit.Failure("%s failed" % MAKER)
    shutil.rmtree(TABLE, ignore_errors=True)
    os.rename(aside, TABLE)


class Exports:
    """The contenders; each writes one file, new for each run."""

    def __init__(self, bench):
        self.bench, self.rounds = bench, bench.rounds(ROUNDS)
        self.script_rounds = min(SCRIPT_ROUNDS, self.rounds)
        # The tool finishes its file in the temporary folder and moves it;
        # only within a file system does it do so without copying.
        self.ours = self.process(
            "vtx2csv", [kit.PROGRAMS + "/vtx2csv", "-r9q", TABLE],
            environment={"TMPDIR": os.path.abspath(bench.folder)})
        self.script = self.process(
            "python3 script",
            [sys.executable, "bench/peers/export_script.py", TABLE],
            rounds=self.script_rounds)
        self.cats = self.process("two cats", [
            "sh", "-c", TWO_CATS, "sh", *INPUT, EXPECTED])
        self.plain = self.plain_c() if kit.is_there("cc") else None
        self.all = [one for one in (self.ours, self.plain, self.cats,
                                    self.script) if one]

    def plain_c(self):
        program = self.bench.folder + "/export_plain"
        kit.compile_c("bench/peers/export_plain.c", program)
        return self.process("plain C", [program, TABLE])

    def process(self, name, command, **more):
        path = "%s/%s.csv" % (self.bench.folder, name.replace(" ", "_"))
        process = kit.Process(name, command + [path], **more)
        process.output = path
        return process

    def run(self):
        kit.run_rounds(self.all, self.rounds, remove_output, check_output)
        for process in self.all:
            remove_output(process)

    def peak_mib(self):
        remove_output(self.ours)
        mib = kit.peak_mib(self.ours, self.bench.folder)
        check_output(self.ours)
        remove_output(self.ours)
        return mib


def remove_output(process):
    if os.path.exists(process.output):
        os.remove(process.output)


def check_output(process):
    filecmp.clear_cache()
    if not filecmp.cmp(process.output, EXPECTED, shallow=False):
        raise kit.Failure("%s: %s is not %s" % (
            process.name, process.output, EXPECTED))


def plain_row(exports):
    name, goals = "export, s", {"firm": 0.30, "aim": 0.10}
    if not exports.plain:
        return kit.skipped(name, "plain C", "gcc", **goals)
    return kit.compared(name, exports.ours, exports.plain, **goals)


def memory_row(exports):
    name, peer = "export, peak memory, MiB", "bound"
    if not exports.plain:
        return kit.skipped(name, peer, "gcc", firm=1.0)
    used = exports.peak_mib()
    return kit.Row(name, used, peer, float(MEMORY_BOUND),
                   used / MEMORY_BOUND, firm=1.0)


def rows(bench):
    make_table()
    exports = Exports(bench)
    exports.run()
    bench.notes.append("medians of %d rounds; the python3 script ran in the "
                       "first %d of them" % (exports.rounds,
                                             exports.script_rounds))
    return [
        plain_row(exports),
        kit.compared("export, s", exports.ours, exports.cats,
                     firm=6.0, aim=2.0),
        kit.compared("export, s", exports.ours, exports.script),
        memory_row(exports),
    ]
