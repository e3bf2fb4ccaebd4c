#!/usr/bin/env python3
"""The export as a short script would do it. A peer of the benchmark, with the
tool's output byte for byte; usage: export_script.py DIR OUT.csv

It takes well-made tables only, like its sibling in C.
"""

import datetime
import os
import re
import struct
import sys

RECORD = struct.Struct("<hh" + 9 * "65s" + "53i12h")
RECORD_SIZE = 1259
EPOCH = datetime.date(1970, 1, 1)
SCALES = (0.0001, 0.000001, 0.00000001, 1000.0)

# Texts become strings of the letters that they mean. Two marks that steer the
# direction, and never show, get letters of private use.
LTR_MARK, RTL_MARK = "\ue000", "\ue001"
LETTERS = [chr(code) for code in range(128)]
LETTERS += [chr(code - 128 + 0x5D0) for code in range(128, 155)]
LETTERS += [chr(code - 224 + 0x5D0) for code in range(155, 251)]
LETTERS += ["\ue002", "\ue003", LTR_MARK, RTL_MARK, "\ue004"]
UNSHOWN = re.compile("[\",\ue000-\ue004]")

RUN = re.compile("[^A-Za-z%s]+|[^א-ת%s]*[A-Za-z]" % (LTR_MARK, RTL_MARK))
LTR_START = re.compile("[A-Za-z%s]" % LTR_MARK)
NUMBER_OR_BYTE = re.compile(r"(?:(?!\A)\$)?[0-9]+(?:[,/:+\-.$][0-9]+)*%?|.",
                            re.DOTALL)
MIRRORED = str.maketrans("()[]{}", ")(][}{")


def logical(line):
    """A line as the screen shows it, in reading order."""
    runs = []
    for run in RUN.findall(line):
        if not LTR_START.match(run):
            pieces = NUMBER_OR_BYTE.findall(run.translate(MIRRORED))
            run = "".join(reversed(pieces))
        runs.append(run)
    return "".join(reversed(runs))


def text_cell(field):
    text = "".join([LETTERS[code] for code in field.split(b"\0", 1)[0]])
    lines = [logical(line) for line in text.split("\r\n")]
    return UNSHOWN.sub("", "\r\n".join(lines))


def number_cell(word):
    if word & 1 == 0:
        value = word >> 1
    elif word & 3 == 3:
        value = (word >> 2) * 0.01
        if (word >> 2) % 100 == 0:
            value *= 0.015625
    else:
        value = (word >> 4) * SCALES[word >> 2 & 3]
    text = "%.15g" % value
    if "e" in text:
        mantissa, exponent = text.split("e")
        text = "%se%+04d" % (mantissa, int(exponent))
    return text


def date_cell(days):
    return (EPOCH + datetime.timedelta(days)).strftime("%d-%m-%y")


def row(fields):
    kind, texts, numbers = fields[1], fields[2:11], fields[11:64]
    cells = [number_cell(numbers[0]), text_cell(texts[0]), "BIR"[kind]]
    cells += [text_cell(texts[n]) for n in (1, 2, 8, 3, 4, 5, 6, 7)]
    cells += [number_cell(numbers[n]) for n in (49, 52, *range(1, 49), 50, 51)]
    cells += [date_cell(days) for days in fields[64:]]
    return ", ".join(cells) + "\n"


def header():
    codes = [str(code) for code in range(37424, 37499) if code != 37436]
    return ", ".join(["seccode"] + codes) + "\r\n\r\n"


def main():
    folder, output = sys.argv[1:]
    with open(os.path.join(folder, "D4WVTX.IDX"), "rb") as file:
        entries = file.read()[6:]
    with open(os.path.join(folder, "D4WVTX.BIN"), "rb") as data, \
            open(output, "w", encoding="utf-8", newline="") as out:
        out.write(header())
        for _, _, offset in struct.iter_unpack("<16sii", entries):
            if offset == -1:
                continue
            data.seek(offset)
            record = data.read(RECORD_SIZE)
            if len(record) == RECORD_SIZE and record[4 + 65]:
                out.write(row(RECORD.unpack_from(record)))


if __name__ == "__main__":
    main()
