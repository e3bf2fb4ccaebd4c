#!/usr/bin/env python3
"""A second, slow and obvious export: what vtx2csv must make of a table.

The program under test and this module share nothing, not even a table of
column codes, so that a mistake has to be made twice to go unseen. Numbers are
taken as exact decimals here, never as doubles; that both roads end in the
same text is itself a self test.

    outcome = export_model.export({"D4WVTX.IDX": ..., "R9QVTX.BIN": ...})

`outcome.kind` is "csv", "init" (the table does not open, `outcome.code` says
why) or "fatal" (an assertion of the program). For "csv", `outcome.data` is
the file byte for byte and `outcome.rows` the cells it was joined from.

Self test: python3 tests/e2e/export_model.py --self-test
"""

import functools
import random
import struct
import sys
import unittest

RECORD_SIZE = 1259
DATA_HEAD_SIZE = 55
INDEX_MAGIC = 4321501
TEXT_AT, TEXT_WIDTH = 4, 65
NUM_AT, DATES_AT = 589, 801
LAST_DAY = 32141  # 31-12-57


class Fatal(Exception):
    """An internal assertion of the program: message 1000, exit code 100."""


# ---------------------------------------------------------------- numbers

# The four-bit forms by bits 2 and 3 of the word: decimal places.
FOUR_BIT_PLACES = (4, 6, 8, -3)
FOUR_BIT_FACTORS = (0.0001, 0.000001, 0.00000001, 1000.0)


def signed32(word):
    return (word & 0x7FFFFFFF) - (word & 0x80000000)


def truncated(quotient_of, by):
    """Division towards zero, as the machine does it."""
    whole = abs(quotient_of) // by
    return -whole if quotient_of < 0 else whole


def decode(word):
    """A decimal word as exact (units, places): units x 10 ** -places."""
    word = signed32(word)
    if word & 1 == 0:
        return word >> 1, 0
    if word & 3 == 3:
        hundredths = word >> 2
        if hundredths % 100:
            return hundredths, 2
        return hundredths * 15625, 8  # 0.01 x 0.015625
    return word >> 4, FOUR_BIT_PLACES[word >> 2 & 3]


def decode_double(word):
    """The same word in the program's way: doubles, in its order."""
    word = signed32(word)
    if word & 1 == 0:
        return float(word >> 1)
    if word & 3 == 3:
        value = (word >> 2) * 0.01
        return value if (word >> 2) % 100 else value * 0.015625
    return (word >> 4) * FOUR_BIT_FACTORS[word >> 2 & 3]


def round_to_15(digits, exponent):
    """Half away from zero; a carry out of the top digit moves the point."""
    drop = len(digits) - 15
    if drop <= 0:
        return digits, exponent
    kept = str((int(digits) + 5 * 10 ** (drop - 1)) // 10 ** drop)
    return kept, exponent + len(kept) - 15


def exact_text(units, places):
    """units x 10 ** -places as "%15.15g" without blanks, wide exponent."""
    if units == 0:
        return "0"
    sign, digits = ("-" if units < 0 else ""), str(abs(units))
    digits, exponent = round_to_15(digits, len(digits) - 1 - places)
    digits = digits.rstrip("0")
    if exponent < -4 or exponent >= 15:
        mantissa = digits[0] + ("." + digits[1:] if digits[1:] else "")
        return "%s%se%+04d" % (sign, mantissa, exponent)
    if exponent < 0:
        return sign + "0." + "0" * (-exponent - 1) + digits
    whole, rest = digits[:exponent + 1], digits[exponent + 1:]
    return sign + whole.ljust(exponent + 1, "0") + ("." + rest if rest else "")


def double_text(value):
    """A double through this machine's own "%.15g", exponent widened."""
    mantissa, mark, exponent = ("%.15g" % value).partition("e")
    return mantissa + ("e%+04d" % int(exponent) if mark else "")


@functools.lru_cache(maxsize=1 << 16)
def number_cell(word):
    return exact_text(*decode(word)).encode("ascii")


def scaled(value, factor):
    return int(value * factor + (-0.5 if value < 0 else 0.5))


def encode_huge(value):
    if abs(value) > 1000000000:
        if abs(value) >= 100000000000:
            value = -99999999000.0 if value < 0 else 99999999000.0
        return scaled(value, 0.001) << 4 | 13
    return scaled(value, 1) << 1


def encode_fine(value):
    """The first form whose last two digits are needed, else the plain two."""
    size = abs(value)
    forms = ((size < 1.34, 100000000, 9), (size < 134, 1000000, 5),
             (size <= 13420, 10000, 1))
    for fits, factor, low_bits in forms:
        units = scaled(value, factor)
        if fits and units % 100:
            return units << 4 | low_bits
    units = scaled(value, 100)
    return units << 2 | 3 if units % 100 else units // 100 << 1


def encode(value):
    """The word that stores a number; for those who make tables."""
    value = float(value)
    if abs(value) >= 5000000:
        return encode_huge(value)
    if value == int(value):
        return int(value) << 1
    return encode_fine(value)


def encode_sixty_fourths(whole, parts):
    return (whole * 64 + parts) * 100 * 4 + 3


# ------------------------------------------------------------------ dates

MONTH_STARTS = (0, 31, 59, 90, 120, 151, 181, 212, 243, 273, 304, 334)


def is_leap(year):
    return year % 4 == 0


def date_fields(days):
    """(day, month, year); outside 1970 to 2057 the program gives up."""
    if not 0 <= days <= LAST_DAY:
        raise Fatal("date of %d days" % days)
    year, rest = 1970 + days // 1461 * 4, days % 1461
    while rest >= 365 + is_leap(year):
        rest -= 365 + is_leap(year)
        year += 1
    starts = [start + (is_leap(year) and month >= 2)
              for month, start in enumerate(MONTH_STARTS)]
    month = max(m for m in range(12) if starts[m] <= rest)
    return rest - starts[month] + 1, month + 1, year


@functools.lru_cache(maxsize=None)
def date_cell(days):
    day, month, year = date_fields(days)
    return b"%02d-%02d-%02d" % (day, month, year % 100)


# ----------------------------------------------------------- Hebrew text

LTR_MARK, RTL_MARK = 253, 254
DIGITS = frozenset(b"0123456789")
LATIN = frozenset(b"abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ")
HEBREW = frozenset(range(224, 251))
LTR_STRONG = LATIN | {LTR_MARK}
RTL_STRONG = HEBREW | {RTL_MARK}
STRONG = LTR_STRONG | RTL_STRONG
SEPARATORS = frozenset(b",/:+-.$")
DOS_TO_ANSI = bytes(c + 96 if 128 <= c <= 154 else c for c in range(256))
MIRRORED = bytes.maketrans(b"()[]{}", b")(][}{")


def first_of(text, wanted, start=0):
    """Position of the first byte of a set, or the text's length."""
    for at in range(start, len(text)):
        if text[at] in wanted:
            return at
    return len(text)


def split_run(text):
    """(is right-to-left, length) of the run that starts a line."""
    at = first_of(text, STRONG)
    if at == len(text):
        return True, at
    if text[at] in RTL_STRONG:
        return True, first_of(text, LTR_STRONG, at)
    if at > 0:
        return True, at
    return False, ltr_run_end(text, first_of(text, RTL_STRONG))


def ltr_run_end(text, end):
    """A left-to-right run keeps nothing behind its last Latin letter."""
    while end > 0 and text[end - 1] not in LATIN:
        end -= 1
    if end == 0:
        raise Fatal("left-to-right run without a letter")
    return end


def ends_number(run, at):
    if run[at] in DIGITS:
        return True
    return run[at] == 0x25 and at > 0 and run[at - 1] in DIGITS


def number_start(run, at):
    """First byte of the number that ends at `at`."""
    while at > 0:
        digit = run[at - 1] in DIGITS
        inner = at > 1 and run[at - 1] in SEPARATORS and run[at - 2] in DIGITS
        if not digit and not inner:
            break
        at -= 1
    # A dollar sign at the very start of the run stays outside.
    return at - 1 if at > 1 and run[at - 1] == 0x24 else at


def reverse_run(run):
    """A right-to-left run in reading order, numbers left as they stand."""
    out, at = bytearray(), len(run) - 1
    while at >= 0:
        start = number_start(run, at) if ends_number(run, at) else at
        if start < at or run[at] in DIGITS:
            if out[-1:] == b"$" and run[start] in DIGITS:
                out.append(RTL_MARK)
            out += run[start:at + 1]
        elif run[at] != RTL_MARK:
            out += run[at:at + 1].translate(MIRRORED)
        at = start - 1
    return bytes(out)


def logical_line(line):
    rest, out = line.translate(DOS_TO_ANSI), b""
    while rest:
        rtl, length = split_run(rest)
        piece, rest = rest[:length], rest[length:]
        if rtl:
            piece = reverse_run(piece)
        else:
            first = first_of(out, DIGITS | HEBREW)
            if first < len(out) and out[first] in DIGITS:
                piece += bytes([RTL_MARK])
        out = piece + out
    return out


def logical_lines(text):
    return b"\r\n".join(logical_line(line) for line in text.split(b"\r\n"))


def utf8(text):
    points = (c if c < 128 else c - 224 + 0x5D0 for c in text)
    return "".join(chr(p) for p in points if p <= 0x5EA).encode("utf-8")


def clean_text(text):
    """A stored text field as it stands in the CSV file."""
    return utf8(logical_lines(text)).replace(b'"', b"").replace(b",", b"")


# -------------------------------------------------------------- the rows

def make_columns():
    """(header, kind, field) in output order, first written out by hand."""
    texts_first = [("37424", 0), ("37425", None), ("37426", 1), ("37427", 2),
                   ("37428", 8), ("37429", 3), ("37430", 4), ("37431", 5),
                   ("37432", 6), ("37433", 7)]
    columns = [("seccode", "num", 0)]
    columns += [(code, "natype" if field is None else "text", field)
                for code, field in texts_first]
    numbers = [49, 52] + list(range(1, 49)) + [50, 51]
    codes = [37434, 37435] + list(range(37437, 37487))
    columns += [(str(c), "num", n) for c, n in zip(codes, numbers)]
    columns += [(str(37487 + n), "date", n) for n in range(12)]
    return columns


COLUMNS = make_columns()
HEADER_ROW = (", ".join(c[0] for c in COLUMNS) + "\r\n\r\n").encode("ascii")
TYPE_LETTERS = {0: b"B", 1: b"I", 2: b"R"}


def stored_text(record, field):
    """To the first NUL, through the next fields if need be."""
    start = TEXT_AT + TEXT_WIDTH * field
    end = record.find(b"\0", start)
    return record[start:] if end < 0 else record[start:end]


def cell(record, kind, field):
    if kind == "text":
        return clean_text(stored_text(record, field))
    if kind == "num":
        word, = struct.unpack_from("<i", record, NUM_AT + 4 * field)
        return number_cell(word)
    if kind == "date":
        days, = struct.unpack_from("<h", record, DATES_AT + 2 * field)
        return date_cell(days)
    return TYPE_LETTERS.get(struct.unpack_from("<h", record, 2)[0], b"\0")


def is_free_slot(record):
    return record[TEXT_AT + TEXT_WIDTH] == 0


def row_cells(record):
    return [cell(record, kind, field) for _, kind, field in COLUMNS]


def row_bytes(cells):
    return b", ".join(cells) + b"\n"


# ------------------------------------------------------------- the table

class Outcome:
    """How a run ends; see the head of this module."""

    def __init__(self, kind, code=0, rows=(), why=""):
        self.kind, self.code, self.rows, self.why = kind, code, rows, why

    @property
    def data(self):
        return HEADER_ROW + b"".join(row_bytes(cells) for cells in self.rows)


class InitError(Exception):
    """The code with which opening a table fails."""


def find_file(files, end):
    """The D4W file if it is there, otherwise the R9Q one, otherwise None."""
    by_name = {name.upper(): data for name, data in files.items()}
    return by_name.get("D4WVTX" + end, by_name.get("R9QVTX" + end))


def read_index(files):
    """The offsets of all entries, in order."""
    data = find_file(files, ".IDX")
    if data is None:
        raise InitError(1)
    if len(data) < 6 or struct.unpack_from("<I", data)[0] != INDEX_MAGIC:
        raise InitError(2)
    count, = struct.unpack_from("<h", data, 4)
    if count < 1:
        raise Fatal("index of %d entries" % count)
    if (len(data) - 6) // 24 != count:
        raise InitError(2)
    return [struct.unpack_from("<i", data, 6 + 24 * i + 20)[0]
            for i in range(count)]


def digits_as_int(digits):
    """A run of digits read as 32-bit integer; too large reads as 0."""
    value = int(digits or b"0")
    return value if value <= 0x7FFFFFFF else 0


def is_good_head(head):
    name = head.split(b"\0")[0]
    if name.rstrip(b"0123456789") != b"R9QVTX":
        return False
    return digits_as_int(name[6:]) >= 101


def read_data(files):
    data = find_file(files, ".BIN")
    if data is None or len(data) < DATA_HEAD_SIZE:
        raise InitError(5)
    if not is_good_head(data[:DATA_HEAD_SIZE]):
        raise InitError(6)
    if len(data) < DATA_HEAD_SIZE + RECORD_SIZE:
        raise InitError(5)
    return data


def record_at(data, offset):
    """The record, or None where the row is left out without a word."""
    if offset == -1:
        return None
    if offset < -1:
        raise Fatal("offset %d" % offset)
    record = data[offset:offset + RECORD_SIZE]
    return record if len(record) == RECORD_SIZE else None


def export_rows(files):
    offsets, data = read_index(files), read_data(files)
    records = (record_at(data, offset) for offset in offsets)
    return [row_cells(record) for record in records
            if record is not None and not is_free_slot(record)]


def export(files):
    """What a run over these files ({name: bytes}) comes to."""
    try:
        return Outcome("csv", rows=export_rows(files))
    except InitError as error:
        return Outcome("init", code=error.args[0])
    except Fatal as error:
        return Outcome("fatal", code=1000, why=str(error))


# ------------------------------------------------------------ self tests

def visual(text):
    """Test notation: A to Z are Hebrew letters from alef on, < and > are
    the left-to-right and the right-to-left mark, ~ is byte 251."""
    table = {"<": LTR_MARK, ">": RTL_MARK, "~": 251}
    table.update((chr(65 + i), 224 + i) for i in range(26))
    return bytes(table.get(c, ord(c)) for c in text)


REORDERED = (  # stored, expected
    ("", ""),
    ("CBA", "ABC"),
    ("abc", "abc"),
    ("abc def", "abc def"),
    ("abc.", ".abc"),
    (".abc", "abc."),
    ("abc12", "12abc"),
    ("12abc", "abc>12"),
    ("a1b", "a1b"),
    ("CB A", "A BC"),
    ("A12", "12A"),
    ("A 12,345.67 B", "B 12,345.67 A"),
    ("A 1 2 B", "B 2 1 A"),
    ("A7B", "B7A"),
    ("12/05/08 A", "A 12/05/08"),
    ("A 10:30", "10:30 A"),
    ("A-5 B", "B 5-A"),
    ("A -5 B", "B 5- A"),
    ("A +15 B", "B 15+ A"),
    ("A1-5B", "B1-5A"),
    ("A1..5B", "B5..1A"),
    ("A1.B", "B.1A"),
    (".5A", "A5."),
    ("A(B)C", "C(B)A"),
    ("A(", ")A"),
    ("[A}", "{A]"),
    ("A <", None),
    ("50% A", "A 50%"),
    ("5% A", "A 5%"),
    ("A %50", "50% A"),
    ("%5", "5%"),
    ("1%2%", "2%1%"),
    ("A (12.5%)", "(12.5%) A"),
    ("(%5.21) A", "A (5.21%)"),
    ("A %", "% A"),
    ("A $12 B", "B $12 A"),
    ("A$12", "$12A"),
    ("A$5", "$5A"),
    ("$12", "12$"),
    ("$12 A", "A 12$"),
    ("$$12", "$12$"),
    ("12$ A", "A $>12"),
    ("5$", "$>5"),
    ("5$A", "A$>5"),
    ("1$2", "1$2"),
    ("A1$$2", "$2$>1A"),
    ("A>B", "BA"),
    (">", ""),
    (">12", "12"),
    ("<", None),
    ("<A", None),
    ("<12A", None),
    ("<.>abc", None),
    ("<a", "<a"),
    ("a<", None),
    ("a<b", "a<b"),
    ("a>b", "ba"),
    ("12<a", "<a>12"),
    ("abcA", "Aabc"),
    ("Aabc", "abcA"),
    ("abc 12A", "A12 abc"),
    ("abc A12", "12A abc"),
    ("A 12 abc", "abc> 12 A"),
    ("12A abc", "abc A12"),
    ("A 1.abc", "abc>.1 A"),
    ("ABabcCD", "DCabcBA"),
    ("abc 12 def", "abc 12 def"),
    ("abc 12 def 3 A", "A 3 abc 12 def"),
    ("abcA 12", "12 Aabc"),
    ("abc, def, A", "A ,abc, def"),
    ("ab(cd)", "(ab(cd"),
    ("(ab)", "(ab)"),
    ("A~B", "B~A"),
    ("abc~", "~abc"),
    ("abc\r\nA1", "abc\r\n1A"),
    ("BA\r\n\r\nab.\r\n", "AB\r\n\r\n.ab\r\n"),
    ("BA\rab", "ab\rAB"),
    ("BA\nDC", "CD\nAB"),
)

CLEANED = (  # stored bytes, expected bytes
    (b"", b""),
    (b"ABC", b"ABC"),
    (b"\x82\x81\x80", b"\xd7\x90\xd7\x91\xd7\x92"),
    (b"\xe2\xe1\xe0", b"\xd7\x90\xd7\x91\xd7\x92"),
    (b"\x9a\xfa", b"\xd7\xaa\xd7\xaa"),
    (b"\x9b", b"\xd6\x8b"),
    (b"\xdf", b"\xd7\x8f"),
    (b"\xfb\xfc\xff", b""),
    (b"a\xfdb", b"ab"),
    (b"12abc", b"abc12"),
    (b'a "b", c|d', b"a b c|d"),
    (b"\x80 1,.2", b"2.1 \xd7\x90"),
    (b'\x80 1"2', b"21 \xd7\x90"),
    (b"\x80 1,234", b"1234 \xd7\x90"),
    (b"a.\r\n\x801", b".a\r\n1\xd7\x90"),
)

DECODED = (  # word, expected cell
    (0, "0"), (2, "1"), (-2, "-1"), (1, "0"), (3, "0"), (5, "0"), (13, "0"),
    (7, "0.01"), (-1, "-0.01"), (403, "0.015625"), (-397, "-0.015625"),
    (160001, "1"), (17, "0.0001"), (-15, "-0.0001"), (21, "1e-006"),
    (25, "1e-008"), (-7, "-1e-008"), (29, "1000"), (-3, "-1000"),
    (5007, "12.51"), (1234 * 16 + 9, "1.234e-005"),
    (12345678 * 16 + 9, "0.12345678"), (6400 * 4 + 3, "1"),
    (0x7FFFFFFF, "5368709.11"), (0x7FFFFFFE, "1073741823"),
    (0x80000000, "-1073741824"), (0x80000001, "-13421.7728"),
    (0x7FFFFFFD, "134217727000"), (0x7FFFFFF9, "1.34217727"),
    (0x7FFFFFF5, "134.217727"), (0x7FFFFFF1, "13421.7727"),
)

WIDENED = (  # units, places, expected text
    (10 ** 15, 0, "1e+015"), (10 ** 14, 0, "100000000000000"),
    (1, 8, "1e-008"), (1234, 8, "1.234e-005"), (1, 4, "0.0001"),
    (12, 105, "1.2e-104"), (-125, 1, "-12.5"),
    (1234567890123455, 1, "123456789012346"),
    (9999999999999995, 0, "1e+016"),
    (1234567890123454, 0, "1.23456789012345e+015"),
)

ENCODED = (  # value, expected word
    (0, 0), (1, 2), (-1, -2), (2000000, 4000000),
    (0.5, 50 * 4 + 3), (1.5, 150 * 4 + 3), (200.25, 20025 * 4 + 3),
    (-0.01, -1), (0.12345678, 12345678 * 16 + 9), (0.123456, 123456 * 16 + 5),
    (12.3456, 123456 * 16 + 1), (2000000.5, 200000050 * 4 + 3),
    (123456789012, 99999999 * 16 + 13), (6000000, 12000000),
    (6000000.5, 12000002), (-1000000001, -1000000 * 16 + 13),
)

DATES = (
    (0, "01-01-70"), (30, "31-01-70"), (31, "01-02-70"), (58, "28-02-70"),
    (59, "01-03-70"), (364, "31-12-70"), (365, "01-01-71"),
    (730, "01-01-72"), (789, "29-02-72"), (790, "01-03-72"),
    (1095, "31-12-72"), (1096, "01-01-73"), (1460, "31-12-73"),
    (1461, "01-01-74"), (10957, "01-01-00"), (11016, "29-02-00"),
    (LAST_DAY, "31-12-57"),
)


def head_of(version=b"101"):
    return (b"R9QVTX" + version).ljust(DATA_HEAD_SIZE, b"\0")


def index_of(*offsets):
    entries = b"".join(struct.pack("<16sii", b"x", i, offset)
                       for i, offset in enumerate(offsets))
    return struct.pack("<Ih", INDEX_MAGIC, len(offsets)) + entries


def record_of(kind=0, text=b"a"):
    record = bytearray(RECORD_SIZE)
    struct.pack_into("<hh", record, 0, 0, kind)
    record[TEXT_AT + TEXT_WIDTH:TEXT_AT + TEXT_WIDTH + len(text)] = text
    return bytes(record)


def pair(index, data):
    return {"D4WVTX.IDX": index, "R9QVTX.BIN": data}


class NumberTest(unittest.TestCase):
    def test_words_decode_to_their_text(self):
        for word, text in DECODED:
            with self.subTest(word=word):
                self.assertEqual(number_cell(word), text.encode())

    def test_exponents_have_three_digits_and_ties_go_away_from_zero(self):
        for units, places, text in WIDENED:
            with self.subTest(units=units, places=places):
                self.assertEqual(exact_text(units, places), text)

    def test_the_double_road_gives_the_same_text(self):
        rng = random.Random(1)
        words = [w for w, _ in DECODED] + list(range(-5000, 5000))
        words += [rng.getrandbits(rng.randint(4, 32)) for _ in range(40000)]
        words += [encode_sixty_fourths(rng.randint(-79999, 79999),
                                       rng.randint(0, 63))
                  for _ in range(5000)]
        for word in words:
            self.assertEqual(number_cell(word).decode(),
                             double_text(decode_double(word)), hex(word))

    def test_values_encode_to_the_coarsest_form_that_holds_them(self):
        for value, word in ENCODED:
            with self.subTest(value=value):
                self.assertEqual(encode(value), word)

    def test_encoded_values_decode_to_themselves(self):
        rng = random.Random(2)
        for _ in range(5000):
            places = rng.choice((0, 1, 2, 4, 6, 8))
            top = {4: 13420, 6: 133, 8: 1}.get(places, 4999999)
            value = round(rng.uniform(-top, top), places) + 0.0
            self.assertEqual(number_cell(encode(value)).decode(),
                             double_text(value))


class DateTest(unittest.TestCase):
    def test_day_counts_print_as_dates(self):
        for days, text in DATES:
            with self.subTest(days=days):
                self.assertEqual(date_cell(days), text.encode())

    def test_days_follow_the_calendar_of_the_platform(self):
        import datetime
        day = datetime.date(1970, 1, 1)
        for days in range(LAST_DAY + 1):
            self.assertEqual(date_fields(days), (day.day, day.month, day.year))
            day += datetime.timedelta(1)

    def test_days_outside_the_calendar_are_fatal(self):
        for days in (-1, -32768, LAST_DAY + 1, 32767):
            self.assertRaises(Fatal, date_cell, days)


class TextTest(unittest.TestCase):
    def test_lines_come_out_in_reading_order(self):
        for stored, expected in REORDERED:
            with self.subTest(stored=stored):
                if expected is None:
                    self.assertRaises(Fatal, logical_lines, visual(stored))
                else:
                    self.assertEqual(logical_lines(visual(stored)),
                                     visual(expected))

    def test_fields_are_cleaned(self):
        for stored, expected in CLEANED:
            with self.subTest(stored=stored):
                self.assertEqual(clean_text(stored), expected)


class RowTest(unittest.TestCase):
    def test_every_field_is_shown_once(self):
        shown = sorted((kind, field) for _, kind, field in COLUMNS
                       if kind != "natype")
        self.assertEqual(shown, [("date", n) for n in range(12)]
                         + [("num", n) for n in range(53)]
                         + [("text", n) for n in range(9)])
        self.assertEqual(len(COLUMNS), 75)
        self.assertEqual(COLUMNS[2][1], "natype")

    def test_columns_stand_at_the_contracted_places(self):
        places = (
            (0, ("seccode", "num", 0)), (5, ("37428", "text", 8)),
            (10, ("37433", "text", 7)), (11, ("37434", "num", 49)),
            (12, ("37435", "num", 52)), (13, ("37437", "num", 1)),
            (60, ("37484", "num", 48)), (61, ("37485", "num", 50)),
            (62, ("37486", "num", 51)), (63, ("37487", "date", 0)),
            (74, ("37498", "date", 11)))
        for at, column in places:
            self.assertEqual(COLUMNS[at], column)

    def test_header_ends_in_two_line_ends(self):
        self.assertTrue(HEADER_ROW.startswith(b"seccode, 37424, 37425, 37426, "
                                              b"37427, 37428, "))
        self.assertTrue(HEADER_ROW.endswith(b", 37497, 37498\r\n\r\n"))

    def test_a_quiet_record_gives_zeros(self):
        for kind, letter in ((0, b"B"), (1, b"I"), (2, b"R"), (3, b"\0"),
                             (-1, b"\0")):
            row = row_bytes(row_cells(record_of(kind)))
            self.assertEqual(row, b"0, , " + letter + b", a" + b", " * 7
                             + b", 0" * 52 + b", 01-01-70" * 12 + b"\n")

    def test_an_unterminated_field_runs_on_to_the_next_nul(self):
        record = bytearray(record_of(text=b"a" * 65 + b"bc"))
        cells = row_cells(bytes(record))
        self.assertEqual(cells[3], b"a" * 65 + b"bc")
        self.assertEqual(cells[4], b"bc")

    def test_a_field_without_any_nul_ends_with_the_record(self):
        record = b"\0" * 524 + b"a" * (RECORD_SIZE - 524)
        self.assertEqual(stored_text(record, 8), b"a" * 735)


class TableTest(unittest.TestCase):
    def assert_init(self, code, files):
        outcome = export(files)
        self.assertEqual((outcome.kind, outcome.code), ("init", code))

    def assert_rows(self, count, files):
        outcome = export(files)
        self.assertEqual((outcome.kind, len(outcome.rows)), ("csv", count))

    def test_an_index_must_be_there(self):
        self.assert_init(1, {"R9QVTX.BIN": head_of() + record_of()})

    def test_an_index_must_hold_what_its_head_says(self):
        data = head_of() + record_of()
        self.assert_init(2, pair(index_of(55)[:5], data))
        self.assert_init(2, pair(b"\0" + index_of(55)[1:], data))
        self.assert_init(2, pair(index_of(55)[:-1], data))
        self.assert_init(2, pair(index_of(55) + bytes(24), data))
        self.assert_rows(1, pair(index_of(55) + bytes(23), data))

    def test_an_index_of_no_entries_is_fatal(self):
        for count in (b"\0\0", b"\0\x80", b"\xff\xff"):
            files = pair(index_of()[:4] + count, head_of() + record_of())
            self.assertEqual(export(files).kind, "fatal")

    def test_the_data_must_hold_a_head_and_one_record(self):
        self.assert_init(5, {"D4WVTX.IDX": index_of(55)})
        self.assert_init(5, pair(index_of(55), head_of()[:-1]))
        self.assert_init(5, pair(index_of(55), head_of()))
        self.assert_init(5, pair(index_of(55), head_of() + record_of()[:-1]))

    def test_the_head_must_name_a_known_version(self):
        for version, is_good in ((b"101", True), (b"102", True),
                                 (b"1015", True), (b"0101", True),
                                 (b"2147483647", True), (b"100", False),
                                 (b"", False), (b"2147483648", False),
                                 (b"101x", False), (b"1" * 49, False)):
            self.assertEqual(is_good_head(head_of(version)), is_good, version)
        self.assertFalse(is_good_head(b"R9QVTZ101".ljust(55, b"\0")))
        self.assert_init(6, pair(index_of(55), head_of(b"100") + record_of()))

    def test_rows_that_cannot_be_read_are_left_out(self):
        data = head_of() + record_of() + record_of()[:-1]
        index = index_of(55, -1, 55 + 1259, 99999, 0x7FFFFFFF, 55)
        self.assert_rows(2, pair(index, data))

    def test_a_record_without_its_second_text_is_left_out(self):
        data = head_of() + record_of(text=b"") + record_of()
        self.assert_rows(1, pair(index_of(55, 55 + 1259), data))

    def test_an_offset_below_minus_one_is_fatal(self):
        files = pair(index_of(-2), head_of() + record_of())
        self.assertEqual(export(files).kind, "fatal")

    def test_the_first_name_set_wins(self):
        files = {"D4WVTX.IDX": index_of(55), "R9QVTX.IDX": b"",
                 "R9QVTX.BIN": b"", "d4wvtx.bin": head_of() + record_of()}
        self.assert_rows(1, files)

    def test_a_table_without_live_rows_is_a_header(self):
        files = pair(index_of(-1), head_of() + record_of())
        self.assertEqual(export(files).data, HEADER_ROW)


def self_test():
    """True if the model agrees with its hand-worked examples."""
    suite = unittest.defaultTestLoader.loadTestsFromModule(
        sys.modules[__name__])
    return unittest.TextTestRunner(verbosity=0).run(suite).wasSuccessful()


if __name__ == "__main__":
    if sys.argv[1:] != ["--self-test"]:
        sys.exit(__doc__)
    sys.exit(0 if self_test() else 1)
