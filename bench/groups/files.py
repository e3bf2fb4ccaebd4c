"""Reading a file of 100 MB line by line beside other ways to do so.

The program is bench/files.cpp. All figures are nanoseconds per line.
"""

import kit

PACKAGES = kit.GoogleBenchmark.PACKAGES

REPETITIONS = 9


def rows(bench):
    program = kit.GoogleBenchmark("bench_files", bench,
                                  bench.rounds(REPETITIONS))
    return [
        program.compared("lines of mixed lengths, ns", "lines_c",
                         "getline of C", firm=1.0),
        program.compared("lines of mixed lengths, ns", "lines_std",
                         "std::getline", firm=1.0),
    ]
