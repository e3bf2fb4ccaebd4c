"""Reading files of 100 MB line by line and copying one of 500 MB, beside
other ways to do so.

The lines are read by bench/files.cpp, whose figures are nanoseconds per line.
A copy is a whole process, in seconds: bench/copy_file.cpp, and cp. Neither
waits for the disk; every copy is a new file and is compared with its source.
"""

import filecmp
import os

import kit

PACKAGES = {**kit.GoogleBenchmark.PACKAGES, "coreutils": "cp"}

REPETITIONS = 9

COPY_SIZE, PIECE = 500_000_000, 1_000_000


def line_rows(bench):
    program = kit.GoogleBenchmark("bench_files", bench,
                                  bench.rounds(REPETITIONS))
    return [
        program.compared("lines, %s, ns" % lengths, "%s_%s" % (lengths, what),
                         peer, firm=1.0)
        for lengths in ("mixed", "short")
        for what, peer in (("c", "getline of C"), ("std", "std::getline"))]


def make_source(path):
    """Bytes that no file system can leave out or store once only."""
    with open(path, "wb") as out:
        for _ in range(COPY_SIZE // PIECE):
            out.write(os.urandom(PIECE))


def copy_row(bench):
    source = os.path.abspath(bench.folder + "/source")
    make_source(source)

    def process(name, program):
        target = os.path.abspath("%s/%s.copy" % (bench.folder, name))
        result = kit.Process(name, [program, source, target])
        result.output = target
        return result

    def remove(copy):
        if os.path.exists(copy.output):
            os.remove(copy.output)

    def check(copy):
        filecmp.clear_cache()
        if not filecmp.cmp(source, copy.output, shallow=False):
            raise kit.Failure("%s: the copy differs" % copy.name)
        remove(copy)

    ours = process("cpfile", kit.BENCH_PROGRAMS + "/bench_copy_file")
    peer = process("cp", "cp")
    kit.run_rounds([ours, peer], bench.rounds(REPETITIONS), remove, check)
    os.remove(source)
    return kit.compared("copy of 500 MB, s", ours, peer, firm=1.2)


def rows(bench):
    return line_rows(bench) + [copy_row(bench)]
