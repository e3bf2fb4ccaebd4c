"""Strings, arrays, tables and the checksum of keys beside their peers.

The program is bench/core.cpp and its core_*.cpp, which say what one operation
is. All figures are nanoseconds per operation.
"""

import kit

ABSL = {"libabsl-dev": "/usr/include/absl/container/flat_hash_map.h"}
PACKAGES = {**kit.GoogleBenchmark.PACKAGES, **ABSL}

REPETITIONS = 9

STRING, VECTOR, DEQUE = "std::string", "std::vector", "std::deque"
TABLE = "absl::flat_hash_map"

# Name without the unit, benchmark, peer, firm goal and aim.
STRINGS_AND_ARRAYS = [
    ("string: copy, 30 bytes", "copy/30", STRING, 0.2, 0.10),
    ("string: copy, 200 bytes", "copy/200", STRING, 0.2, 0.10),
    ("string: pass by value, 30 bytes", "pass/30", STRING, 0.2, 0.10),
    ("string: pass by value, 200 bytes", "pass/200", STRING, 0.2, 0.10),
    ("string: make of text, 30 bytes", "make/30", STRING, 1.0, 0.5),
    ("string: a + b + c, 30 bytes each", "concatenate/30", STRING, 0.7, 0.4),
    ("string: append a byte, up to 1000", "append_bytes/1000", STRING,
     1.7, 1.0),
    ("array: append, up to 10000", "append/10000", VECTOR, 1.0, 0.75),
    ("array: append, up to 1000000", "append/1000000", VECTOR, 0.3, 0.2),
    ("array: checked read of 10000", "get/10000", VECTOR, 2.4, 1.2),
    ("array: queue of 20, in and out", "queue/20", DEQUE, 2.0, 1.0),
]

# Sizes, operation, firm goal and aim.
TABLE_GOALS = [
    ((100, 1000, 10000), "hit", 1.8, 0.75),
    ((100, 1000, 10000), "miss", 3.0, 0.6),
    ((100, 1000, 10000), "build", 1.1, 0.6),
    ((60000, 300000), "hit", 10.0, 1.1),
    ((60000, 300000), "miss", None, 1.1),
    ((60000, 300000), "build", None, 1.1),
    ((1000,), "hit_by_text", None, None),
]

CHECKSUM = ("checksum of a key", "checksum/1000", "byte table", 0.45, 0.35)


def table_rows(program):
    for sizes, operation, firm, aim in TABLE_GOALS:
        for size in sizes:
            yield program.compared(
                "table: %s, %d keys, ns" % (operation.replace("_", " "), size),
                "%s/%d" % (operation, size), TABLE, firm, aim, needs=ABSL)


def rows(bench):
    program = kit.GoogleBenchmark("bench_core", bench,
                                  bench.rounds(REPETITIONS))

    def row(name, what, peer, firm, aim):
        return program.compared(name + ", ns", what, peer, firm, aim)

    return ([row(*line) for line in STRINGS_AND_ARRAYS]
            + list(table_rows(program)) + [row(*CHECKSUM)])
