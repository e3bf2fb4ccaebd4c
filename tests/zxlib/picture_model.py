#!/usr/bin/env python3
"""What "%v" makes of a number, a second time: a model of number pictures.

It is written from the rules, one function for each, and shares nothing with
the library: the decimals come from Python's exact decimal arithmetic, and
texts are built from copies instead of in place. zxsfmt_picture_check.py
compares the library with it.

    text_of(value, width, precision, picture)

`value` is a float or an int, `width` and `precision` are numbers or None,
`picture` is the text between the brackets. The outcome is None if the
directive fails.
"""

import decimal
import math
import sys

UNLIMITED = 2 ** 31 - 1  # the room of a number without a width
WIDTH_LIMIT = 40
SENTINEL = -1e30  # this number stands for what is no number
SUFFIXES = ("", "k", "m", "b", "r")
LEVELS = 3

# For each number of decimals the highest value that gets it by itself.
AUTOMATIC = (0.0, 500.0, 100.0, 0.0, 5.0, 0.0, 0.0)

SYMBOLS = {"+": "s", ",": "c", "0": "z", "K": "t", "~": "e"}

# Enough for each double in full: 309 digits ahead of the point and 1074
# behind it.
EXACT = decimal.Context(prec=1600, rounding=decimal.ROUND_HALF_UP)


def flags_of(picture):
    """The set of the letters that a picture sets."""
    flags = set()
    for character in picture:
        if character == " ":
            continue
        letter = SYMBOLS.get(character, character)
        assert "a" <= letter <= "z", picture
        flags.add(letter)
    return flags


def fixed(value, precision):
    """A number with that many decimals, ties away from zero. The one that
    still has a sign here is a negative zero, which keeps it."""
    if math.isinf(value):
        return "inf"
    unit = decimal.Decimal(1).scaleb(-precision, context=EXACT)
    rounded = decimal.Decimal(value).quantize(unit, context=EXACT)
    return format(rounded, "f")


def automatic_precision(value):
    if value == 0:
        return 0
    for decimals in range(6, 0, -1):
        if AUTOMATIC[decimals] != 0 and AUTOMATIC[decimals] >= value:
            return decimals
    return 0


# ------------------------------------------------------------ one attempt

def without_zeros(text, precision, flags):
    """The text without the zeros that the flags take off its end."""
    at = len(text)
    while precision > 0 and text[at - 1] == "0":
        at -= 1
        precision -= 1
    if text[at - 1] == ".":
        return text[:at - 1]
    return text[:at] if "z" in flags else text


def suffix(level, flags, more=0):
    return SUFFIXES[level + ("t" in flags) + more]


def with_whole_suffix(text, level, flags):
    """The text with a suffix for its last zeros, or None if it gets none."""
    if "." in text or not flags & {"k", "m"}:
        return None
    zeros = 6 if "m" in flags else 3
    if not text.endswith("0" * zeros):
        return None
    return text[:-zeros] + suffix(level, flags, 2 if "m" in flags else 1)


def integer_part(text):
    """(digits ahead of the point and of a suffix, all that follows)."""
    part = text.partition(".")[0]
    if "a" <= part[-1:] <= "z":
        part = part[:-1]
    return part, text[len(part):]


def commas_wanted(text, flags):
    if "c" not in flags:
        return 0
    return max(0, len(integer_part(text)[0]) - 1) // 3


def with_decimals_cut(text, spare):
    """(shorter text, spare room): decimals go one at a time."""
    while spare < 0 and text[-1] != ".":
        text = text[:-1]
        spare += 1
    if text[-1] == ".":
        text = text[:-1]
        spare += 1
    return text, spare


def with_commas(text, count):
    part, rest = integer_part(text)
    groups = []
    for _ in range(count):
        groups.insert(0, part[-3:])
        part = part[:-3]
    return ",".join([part] + groups) + rest


def attempt(value, precision, level, room, flags):
    text = fixed(value, precision)
    if flags & {"z", "i"}:
        text = without_zeros(text, precision, flags)
    whole = with_whole_suffix(text, level, flags)
    is_pending = level > 0 and whole is None
    if whole is not None:
        text = whole

    wanted = commas_wanted(text, flags)
    spare = room - len(text) - wanted - is_pending
    is_cut = spare < 0 and "." in text
    if is_cut:
        text, spare = with_decimals_cut(text, spare - ("e" in flags))

    allowed = min(wanted, spare + wanted)
    if level > 0 and not is_cut:
        allowed -= 1
    text = with_commas(text, max(allowed, 0))
    if is_pending:
        text += suffix(level, flags)
    if "e" in flags and (is_cut or level > 0):
        text = "~" + text
    return text


# -------------------------------------------------------------- the whole

def room_of(width, flags, is_negative):
    room = UNLIMITED if width is None else width
    room -= is_negative or "s" in flags
    room -= is_negative and "f" in flags
    return room - ("p" in flags) - ("d" in flags)


def scaled_to_fit(value, precision, room, flags):
    """The text of the first level that fits, else of the last one."""
    flags = set(flags)
    for level in range(LEVELS):
        text = attempt(value, precision, level, room, flags)
        if len(text) <= room:
            break
        precision = 0
        flags.discard("k")
        if "m" in flags:
            flags.remove("m")
            flags.add("k")
        value *= 0.001
    return text


def with_sign(text, flags, is_negative):
    if not is_negative and "s" not in flags:
        return text
    if is_negative and "f" in flags:
        return "(" + text + ")"
    sign = "-" if is_negative else "+"
    return text + sign if "r" in flags else sign + text


def text_of(value, width, precision, picture):
    value = float(value)
    if value == SENTINEL:
        return None
    if not math.isfinite(value):
        return "#ERR"
    flags = flags_of(picture)
    if "b" in flags and value == 0:
        return " " * (width or 0)
    is_negative = value < 0 and "a" not in flags
    value = -value if value < 0 else value
    room = room_of(width, flags, is_negative)
    if "p" in flags:
        value *= 100.0
    if precision is None:
        precision = automatic_precision(value)
    assert width is None or width < WIDTH_LIMIT, width
    text = scaled_to_fit(value, precision, room, flags)
    if len(text) > room:
        text = "*" * room
    text = with_sign(text, flags, is_negative)
    text += "%" * ("p" in flags) + "$" * ("d" in flags)
    return text.rjust(width or 0)


# -------------------------------------------------------------- self test

# Rows worked out by hand: value, width, precision, picture, text.
ROWS = (
    (1234567.0, None, None, ",", "1,234,567"),
    (3.14159, 5, None, "", "3.141"),
    (5000000, None, None, "m", "5m"),
    (5000, None, None, "k", "5k"),
    (5000000, None, None, "mK", "5b"),
    (5000, None, None, "kK", "5m"),
    (1234567, 5, None, "", "1235k"),
    (1234567, 5, None, "~", "  ~1m"),
    (1500, 3, None, "", " 2k"),
    (123456789012, 5, None, "", "*****"),
    (0, None, None, "b", ""),
    (0, 4, None, "b", "    "),
    (0.25, None, None, "p", "25.00%"),
    (1.5, None, 4, "0", "1.5"),
    (1.0, None, 4, "i", "1"),
    (1.5, None, 4, "i", "1.5000"),
    (-12.5, None, 1, "f", "(12.5)"),
    (-12.5, None, 1, "r", "12.5-"),
    (12.5, None, 1, "+", "+12.5"),
    (-12.5, None, 1, "a", "12.5"),
    (99.5, None, None, "d", "99.50$"),
    (7, None, None, "", "7.00"),
    (3, None, None, "", "3.0000"),
    (99.999, None, None, "", "100.00"),
    (-1, 1, None, "", "-"),
    (1234567890, 7, None, ",", "  1235m"),
    (1.5, 4, None, "i", "1.50"),
    (-0.0, None, 2, "", "-0.00"),
    (0.5, None, 0, "", "1"),
    (2.5, None, 0, "", "3"),
    (math.nan, 9, 2, "", "#ERR"),
    (-1e30, 9, 2, "", None),
)


def self_test():
    """True if all rows come out; tells which do not."""
    good = True
    for *given, text in ROWS:
        got = text_of(*given)
        if got != text:
            print("the model: %r gives %r, expected %r" % (given, got, text),
                  file=sys.stderr)
            good = False
    return good


if __name__ == "__main__":
    sys.exit(0 if self_test() else 1)
