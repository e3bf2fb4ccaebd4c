#!/usr/bin/env python3
"""Gives the format language random numbers and number pictures, and compares
what it makes of them with the model.

    zxsfmt_picture_check.py --tool "LAUNCHER... PATH/zx_tests" --bin-dir DIR
                            [--quick] [--seed N] [--only]

The test program carries out its case zxsfmt_picture_rows, which reads rows
and answers each with one line; zxsfmt_picture_test.cpp has the form of both.
The rows go to it in batches, each of a seed of its own. `--seed` moves the
first one, `--only` runs that one alone.

Exit codes: 0 all alike, 1 a difference, 77 the program is not there.
"""

import math
import os
import random
import struct
import subprocess
import sys
import tempfile

sys.dont_write_bytecode = True
sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)),
                                "..", "kit"))

import checks  # noqa: E402  (only after the lines above)
import picture_model as model  # noqa: E402

CASE = "zxsfmt_picture_rows"
BATCH = 20000
BATCHES, BATCHES_QUICK = 100, 5
TIME_LIMIT = 300
SHOWN = 10  # differences

MARKED = "+,0K~"
NAMED = "sczetikmbafrpd"
WITHOUT_MEANING = "ghjlnoquvwxy"
LONGEST_PICTURE = 19

TEXTS_AHEAD = ("", "", "", "x", "1000", "0.", "0.00", "k,", "a b-")
TEXTS_BEHIND = ("", "|", "0", ".5")


# ---------------------------------------------------------------- values

def bits_of(value):
    return struct.unpack("<Q", struct.pack("<d", value))[0]


def double_of(bits):
    return struct.unpack("<d", struct.pack("<Q", bits))[0]


def any_bits(rng):
    return double_of(rng.getrandbits(64))


def few_decimals(rng):
    return rng.randrange(10 ** rng.randint(1, 13)) / 10 ** rng.randint(0, 6)


def nudged(rng, value):
    """The number or one of its nearest neighbours."""
    toward = rng.choice((-math.inf, math.inf))
    for _ in range(rng.choice((0, 1, 1, 2))):
        value = math.nextafter(value, toward)
    return value


def near_power(rng):
    return nudged(rng, float("1e%d" % rng.randint(-8, 20)))


def near_thousands(rng):
    """Where one level of suffixes ends, less what rounds up, or not."""
    top = 1000.0 ** rng.randint(1, 5)
    return nudged(rng, top - rng.choice((5, 1, 0.5, 0.05, 0.005, 500, 5e5)))


def whole_with_zeros(rng):
    return float(rng.randint(1, 9999)) * 10 ** rng.randint(0, 14)


def tie(rng):
    return rng.randrange(1, 2 ** rng.randint(2, 40), 2) / 2 ** rng.randint(1, 21)


def automatic_border(rng):
    border = rng.choice((5.0, 100.0, 500.0))
    return nudged(rng, border / rng.choice((1, 1, 100)))


def everyday(rng):
    return rng.uniform(0, 10.0 ** rng.randint(0, 12))


def special(rng):
    return rng.choice((
        0.0, 0.0, -0.0, 1.0, -1.0, 1e30, -1e30, nudged(rng, -1e30), 1e308,
        1.7976931348623157e308, 1e307, 5e-324, -5e-324, 2.2250738585072014e-308,
        1e-300, math.inf, -math.inf, math.nan, 9007199254740993.0, 1e22, 1e23,
        0.5, 1.5, 2.5, 0.125, 999.5, 999999.5, 0.05, 0.005, 0.0005))


DOUBLES = (any_bits, few_decimals, few_decimals, near_power, near_thousands,
           whole_with_zeros, tie, automatic_border, everyday, special)

INTEGER_RANGES = {
    "i": (-2 ** 31, 2 ** 31 - 1), "l": (-2 ** 31, 2 ** 31 - 1),
    "u": (0, 2 ** 32 - 1), "v": (0, 2 ** 32 - 1),
    "c": (-128, 127), "b": (0, 255), "B": (0, 1)}


def random_double(rng):
    value = rng.choice(DOUBLES)(rng)
    return -value if rng.random() < 0.3 else value


def random_integer(rng, tag):
    low, high = INTEGER_RANGES[tag]
    value = rng.choice((
        low, high, 0, rng.randint(low, high), rng.randint(-130, 600),
        rng.randint(-10 ** rng.randint(1, 9), 10 ** rng.randint(1, 9)),
        rng.randint(-2000, 4000) * 1000, rng.randint(-2000, 4000) * 1000000))
    return min(max(value, low), high)


# ------------------------------------------------------------------ rows

class Row:
    """One number and one directive, with text around it."""

    def __init__(self, rng):
        self.tag = "f" if rng.random() < 0.7 else rng.choice("iluvcbB")
        self.value = (random_double(rng) if self.tag == "f"
                      else random_integer(rng, self.tag))
        self.picture = random_picture(rng)
        self.width = random_width(rng)
        self.precision = random_precision(rng)
        if self.is_blank() and rng.random() < 0.2:
            self.width = rng.randint(model.WIDTH_LIMIT, 300)
        self.ahead = rng.choice(TEXTS_AHEAD)
        self.directive = self.random_directive(rng)
        self.behind = rng.choice(TEXTS_BEHIND)

    def is_blank(self):
        """True if blanks are all that is shown; then no width is too much."""
        return (self.value == 0 and self.tag != "B"
                and "b" in (self.picture or ""))

    def random_directive(self, rng):
        text = "%"
        if self.width is not None:
            text += "0" * (rng.random() < 0.1) + str(self.width)
        if self.precision is not None:
            text += "." + str(self.precision)
        if self.picture is not None:
            text += "[" + self.picture + "]"
        return text + "v"

    def format(self):
        return self.ahead + self.directive + self.behind

    def line(self):
        value = ("%016x" % bits_of(self.value) if self.tag == "f"
                 else str(self.value))
        return "%s %s %s\n" % (self.tag, value, self.format())

    def answer(self):
        """The line that the test program has to answer with."""
        picture = "," if self.picture is None else self.picture
        text = None
        if self.tag != "B":  # a truth value is no number
            text = model.text_of(self.value, self.width, self.precision,
                                 picture)
        if text is None:
            return "bad " + self.format()
        return "good " + self.ahead + text + self.behind


def random_picture(rng):
    """None for a directive without one. Flags come in any order, some twice,
    some by their letters."""
    if rng.random() < 0.1:
        return None
    letters = [rng.choice(rng.choice((MARKED, MARKED, NAMED, NAMED, NAMED)))
               for _ in range(rng.choice((0, 1, 1, 2, 2, 3, 4, 5, 7, 12)))]
    if rng.random() < 0.2:
        letters.append(rng.choice(WITHOUT_MEANING))
    while rng.random() < 0.2:
        letters.insert(rng.randint(0, len(letters)), " ")
    return "".join(letters)[:LONGEST_PICTURE]


def random_width(rng):
    return rng.choice((None, None, rng.randint(0, 39), rng.randint(1, 8),
                       rng.randint(2, 14), rng.randint(2, 14)))


def random_precision(rng):
    return rng.choice((None, None, None, rng.randint(0, 20),
                       rng.randint(0, 4), rng.randint(0, 4)))


# ---------------------------------------------------------------- batches

def answers_of(tool, rows):
    """The lines of the test program, and the end that it took."""
    lines = "".join(row.line() for row in rows)
    with tempfile.TemporaryDirectory(prefix="picture_check_") as folder:
        done = subprocess.run(
            tool, cwd=folder, env=dict(os.environ, ZX_CASE=CASE),
            input=lines.encode("ascii"), stdout=subprocess.PIPE,
            stderr=subprocess.PIPE, timeout=TIME_LIMIT)
    return done.stdout.decode("latin-1").splitlines(), done


def differences(tool, seed):
    """Texts of what differs, at most SHOWN."""
    rng = random.Random("pictures %d" % seed)
    rows = [Row(rng) for _ in range(BATCH)]
    answers, done = answers_of(tool, rows)
    found = []
    for row, got in zip(rows, answers):
        expected = row.answer()
        if got != expected and len(found) < SHOWN:
            found.append("%r (%r)\n  expected %r\n  got      %r" % (
                row.line(), row.value, expected, got))
    if done.returncode != 0 or len(answers) != len(rows):
        found.append("exit code %d after %d of %d rows; %r" % (
            done.returncode, len(answers), len(rows), done.stderr[-2000:]))
    return ["seed %d: %s" % (seed, text) for text in found]


def seeds_of(arguments):
    first = arguments.seed
    if arguments.only:
        return range(first, first + 1)
    return range(first, first + (BATCHES_QUICK if arguments.quick else BATCHES))


def main():
    arguments = checks.parse_arguments("Compares number pictures with their model.")
    tool = checks.resolved_tool(arguments, "zx_tests")
    if tool is None:
        return checks.SKIPPED
    if not model.self_test():
        print("the model fails its self test")
        return 1
    seeds = seeds_of(arguments)
    for seed in seeds:
        found = differences(tool, seed)
        if found:
            print("\n".join(found))
            return 1
    print("picture_check: %d numbers alike" % (len(seeds) * BATCH))
    return 0


if __name__ == "__main__":
    sys.exit(main())
