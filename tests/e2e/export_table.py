#!/usr/bin/env python3
"""Builds tables of securities: small random ones and one of full size.

    table = export_table.build(seed)          # exports without a failure
    table = export_table.build_failing(seed)  # ends the program, or its init

A table is `table.files` ({name: bytes}), its `kind`, and `outcome`, what the
model makes of it. The same seed always gives the same table.

    export_table.py full DIR [--seed N] [--csv]   32767 records, for benchmarks
    export_table.py make DIR --seed N [--failing] one random table, to look at

`--csv` adds the expected file, as expected.csv.
"""

import argparse
import os
import random
import struct
import sys

sys.dont_write_bytecode = True

import export_model as model  # noqa: E402  (only after the line above)

BEYOND = 0x7FFFFFFF
TEXT_ROOM = model.TEXT_WIDTH - 1


class Table:
    def __init__(self, kind, files):
        self.kind, self.files = kind, files
        self.outcome = model.export(files)


def write_files(table, directory):
    os.makedirs(directory, exist_ok=True)
    for name, data in table.files.items():
        with open(os.path.join(directory, name), "wb") as file:
            file.write(data)


# ------------------------------------------------------------------ texts
# Each maker takes a random source and returns a field without a NUL.

ODD_BYTES = b"()[]{}%$.,-+/: \"|'!\t\xfb\xfc\xff\xfe"
SMALL_ALPHABET = b"ab\x80\x81\xe2\xfa1239%$.,-+/:() \xfd\xfe\xfb"
FIGURES = (b"1,234.56", b"$12", b"12.5%", b"7%", b"-5", b"+3.5", b"10:30",
           b"31/12/08", b"(12)", b"8", b"%", b"$", b"5$", b"$5", b"$$40",
           b"1..2", b"1.,2", b".5", b"6.", b"12$", b"3$4", b"[a1]", b"100%",
           b"{7}", b"1-2-3", b"0", b"%50", b"2+2", b"$1,000.00", b"9$8%")


def hebrew_word(rng, base=None):
    base = base or rng.choice((128, 224))
    return bytes(base + rng.randrange(27) for _ in range(rng.randint(1, 8)))


def latin_word(rng):
    letters = b"abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ"
    return bytes(rng.choices(letters, k=rng.randint(1, 8)))


def joined(rng, makers, most=6):
    """Some words with a blank, sometimes another byte, between them."""
    words = []
    for _ in range(rng.randint(0, most)):
        words.append(rng.choice(makers)(rng))
        words.append(b" " if rng.random() < 0.8 else
                     bytes([rng.choice(ODD_BYTES)]))
    return b"".join(words[:-1])


def figure(rng):
    return rng.choice(FIGURES)


def mark(rng):
    return rng.choice((b"\xfd", b"\xfe", b"\xfb", b"\xfc", b"\xff", b"\xfda"))


def hebrew_text(rng):
    return joined(rng, (hebrew_word, hebrew_word, hebrew_word, figure))


def ascii_text(rng):
    if rng.random() < 0.5:
        return joined(rng, (latin_word, latin_word, figure))
    return bytes(rng.randint(32, 126) for _ in range(rng.randint(0, 40)))


def figures_text(rng):
    return joined(rng, (figure, figure, hebrew_word, latin_word, mark), 9)


def alphabet_text(rng):
    return bytes(rng.choices(SMALL_ALPHABET, k=rng.randint(0, 20)))


def hostile_text(rng):
    return bytes(rng.randint(1, 255) for _ in range(rng.randint(0, 64)))


def lines_text(rng):
    breaks = (b"\r\n", b"\r\n", b"\r\n\r\n", b"\r", b"\n", b"\n\r", b"\r\r\n")
    parts = []
    for _ in range(rng.randint(1, 5)):
        parts.append(alphabet_text(rng)[:10])
        parts.append(rng.choice(breaks))
    return b"".join(parts if rng.random() < 0.3 else parts[:-1])


def mixed_text(rng):
    return rng.choice((hebrew_text, ascii_text, figures_text,
                       alphabet_text))(rng)


# ------------------------------------------------------- words and dates

EXTREME_WORDS = [0, 1, 3, 5, 9, 13, -1, -2, -3, -7, -11, -15, 0x7FFFFFFF,
                 0x7FFFFFFE, -0x80000000, -0x7FFFFFFF]
EXTREME_WORDS += [0x7FFFFFF0 | low for low in range(16)]
EXTREME_WORDS += [-0x80000000 | low for low in range(16)]
CORNER_DAYS = (0, 1, 30, 31, 58, 59, 60, 364, 365, 730, 788, 789, 790, 1095,
               1096, 1460, 1461, 10956, 10957, 11015, 11016, 11017, 31776,
               32140, 32141)


def any_word(rng):
    pick = rng.randrange(6)
    if pick == 0:
        return rng.choice(EXTREME_WORDS)
    if pick == 1:
        return model.signed32(rng.getrandbits(28) << 4 | rng.randrange(16))
    if pick == 2:  # the sixty-fourths form and its neighbours
        return (rng.randint(-5368709, 5368709) * 100
                + rng.choice((0, 0, 1, -1))) * 4 + 3
    if pick == 3:  # numbers of few digits in every form
        return rng.randint(-3000, 3000) << 4 | rng.choice((1, 5, 9, 13, 3, 0))
    if pick == 4:
        return rng.randint(-70000, 70000)
    return usual_word(rng)


def usual_word(rng):
    value = rng.choice((rng.uniform(-1, 1), rng.uniform(0, 200),
                        rng.uniform(0, 20000), rng.uniform(0, 9e6),
                        rng.uniform(0, 2e11), float(rng.randint(0, 3000))))
    return model.encode(round(value, rng.randint(0, 8)))


def usual_day(rng):
    if rng.random() < 0.3:
        return rng.choice(CORNER_DAYS)
    return rng.randint(0, model.LAST_DAY)


# ---------------------------------------------------------------- records

def calm(text):
    """The text, changed only if a mark without a letter behind it would
    end the program."""
    for tried in (text, text.replace(b"\xfd", b"\xfda")[:TEXT_ROOM]):
        try:
            model.clean_text(tried)
            return tried
        except model.Fatal:
            pass
    return text.replace(b"\xfd", b"")


def pack_field(rng, text):
    """NUL-terminated; what lies behind the NUL must not matter."""
    text = calm(text[:TEXT_ROOM].replace(b"\0", b" ")) + b"\0"
    left = model.TEXT_WIDTH - len(text)
    return text + (bytes(left) if rng.random() < 0.7 else
                   bytes(rng.getrandbits(8) for _ in range(left)))


def pack_record(kind, fields, words, days, tail=bytes(434)):
    return (struct.pack("<hh", 0, kind) + b"".join(fields)
            + struct.pack("<53i", *words) + struct.pack("<12h", *days) + tail)


def random_tail(rng):
    return bytes(rng.getrandbits(8) for _ in range(434))


def usual_kind(rng):
    return rng.choice((0, 0, 0, 1, 1, 2))


def record(rng, text, word=usual_word, day=usual_day, kind=usual_kind):
    fields = [pack_field(rng, text(rng)) for _ in range(9)]
    if fields[1][0] == 0 and rng.random() < 0.9:
        fields[1] = pack_field(rng, b"\x81" + text(rng))
    return pack_record(kind(rng), fields, [word(rng) for _ in range(53)],
                       [day(rng) for _ in range(12)], random_tail(rng))


def hostile_record(rng):
    data = bytearray(rng.getrandbits(8) for _ in range(model.RECORD_SIZE))
    days = [usual_day(rng) for _ in range(12)]
    struct.pack_into("<12h", data, model.DATES_AT, *days)
    for _ in range(rng.choice((0, 3, 10, 100))):
        data[rng.randrange(4, model.NUM_AT)] = 0
    return bytes(data)


def unterminated_record(rng):
    """A good record in which some fields lost their NUL."""
    data = bytearray(record(rng, mixed_text))
    for field in rng.sample(range(9), rng.randint(1, 4)):
        start = model.TEXT_AT + model.TEXT_WIDTH * field
        length = model.TEXT_WIDTH * rng.choice((1, 1, 1, 2, 3))
        length = min(length, model.NUM_AT - start + 8)
        filler = b"".join(mixed_text(rng) + b" " for _ in range(length))
        data[start:start + length] = filler[:length]
    return bytes(data)


def runaway_record(rng):
    """Not one NUL from some field to the record's last byte."""
    data = bytearray(rng.randint(1, 255) for _ in range(model.RECORD_SIZE))
    text = b"".join(mixed_text(rng) + b"-" for _ in range(600))
    data[4:model.NUM_AT] = text[:model.NUM_AT - 4]
    data[rng.randrange(4, 530)] = 0
    for at in range(model.DATES_AT, model.DATES_AT + 24, 2):
        data[at + 1] = rng.randint(1, 0x7C)
    return bytes(data)


def is_harmless(data):
    try:
        model.row_cells(data)
    except model.Fatal:
        return False
    return True


def tamed(data):
    """The record with a letter behind every left-to-right mark, if without
    that it would end the program."""
    if is_harmless(data):
        return data
    data = bytearray(data)
    for at in range(4, model.RECORD_SIZE):
        if data[at] == model.LTR_MARK:
            tame_mark(data, at)
    return bytes(data)


def tame_mark(data, at):
    if at + 1 < model.NUM_AT and data[at + 1]:
        data[at + 1] = ord("a")
    else:
        data[at] = ord("!")


KINDS = {
    "plain": lambda rng: record(rng, mixed_text),
    "hebrew": lambda rng: record(rng, hebrew_text),
    "ascii": lambda rng: record(rng, ascii_text),
    "figures": lambda rng: record(rng, figures_text),
    "alphabet": lambda rng: record(rng, alphabet_text),
    "hostile text": lambda rng: record(rng, hostile_text, any_word),
    "hostile": hostile_record,
    "lines": lambda rng: record(rng, lines_text),
    "unterminated": unterminated_record,
    "runaway": runaway_record,
    "decimals": lambda rng: record(rng, latin_word, any_word),
    "dates": lambda rng: record(rng, latin_word, day=lambda r:
                                r.choice(CORNER_DAYS)),
    "types": lambda rng: record(rng, ascii_text, kind=lambda r:
                                r.choice((-32768, -2, -1, 0, 1, 2, 3, 4, 5,
                                          256, 32767))),
    "quiet": lambda rng: pack_record(0, [pack_field(random.Random(0), b"q")]
                                     * 9, [rng.randrange(9999)] * 53,
                                     [0] * 12),
}


# --------------------------------------------------------------- the files

GOOD_VERSIONS = (b"101",) * 6 + (b"102", b"999", b"1015", b"0101",
                                 b"2147483647")
NAME_PAIRS = (("D4WVTX", "D4WVTX"), ("R9QVTX", "R9QVTX"),
              ("D4WVTX", "R9QVTX"), ("R9QVTX", "D4WVTX"))


def data_head(rng, version=b"101", name=b"R9QVTX"):
    text = name + version + b"\0"
    return text + bytes(rng.getrandbits(8)
                        for _ in range(model.DATA_HEAD_SIZE - len(text)))


def index_file(rng, offsets, count=None, magic=model.INDEX_MAGIC):
    count = len(offsets) if count is None else count
    entries = [struct.pack("<16sii", hebrew_word(rng), rng.getrandbits(20),
                           offset) for offset in offsets]
    return struct.pack("<Ih", magic, count) + b"".join(entries)


def named(rng, index, data):
    """The two files under a pair of names, with a decoy now and then."""
    first, second = rng.choice(NAME_PAIRS)
    files = {first + ".IDX": index, second + ".BIN": data}
    if first == "D4WVTX" and rng.random() < 0.1:
        files["R9QVTX.IDX"] = b"not looked at"
    if second == "D4WVTX" and rng.random() < 0.1:
        files["R9QVTX.BIN"] = b"not looked at"
    if rng.random() < 0.05:
        return {name.lower(): content for name, content in files.items()}
    return files


def odd_offset(rng, data):
    """An offset that no writer makes, but that the program can meet."""
    return rng.choice((-1, -1, BEYOND, len(data), len(data) - 1,
                       len(data) - model.RECORD_SIZE + 1,
                       len(data) + rng.randrange(5000),
                       rng.randrange(model.DATA_HEAD_SIZE),
                       rng.randrange(len(data))))


def is_safe_offset(data, offset):
    found = model.record_at(data, offset)
    return found is None or is_harmless(found)


def offsets_for(rng, data, records, odd):
    """Every record once in some order, among `odd` others."""
    offsets = [model.DATA_HEAD_SIZE + model.RECORD_SIZE * i
               for i in range(records)]
    if rng.random() < 0.5:
        rng.shuffle(offsets)
    for _ in range(odd):
        offset = odd_offset(rng, data)
        if rng.random() < 0.2:
            offset = rng.choice(offsets)
        if not is_safe_offset(data, offset):
            offset = -1
        offsets.insert(rng.randrange(len(offsets) + 1), offset)
    return offsets


def table_of(rng, kind, records):
    data = data_head(rng, rng.choice(GOOD_VERSIONS)) + b"".join(records)
    if rng.random() < 0.3:  # the last record was never written to its end
        data += KINDS[kind](rng)[:rng.randrange(1, model.RECORD_SIZE)]
    odd = rng.randint(0, 12) if rng.random() < 0.5 else 0
    index = index_file(rng, offsets_for(rng, data, len(records), odd))
    if rng.random() < 0.1:  # less than an entry behind the last one
        index += bytes(rng.getrandbits(8) for _ in range(rng.randrange(1, 24)))
    return Table(kind, named(rng, index, data))


def record_count(rng):
    return rng.choice((1, 1, 2, 3, rng.randint(1, 12), rng.randint(1, 25),
                       rng.randint(1, 60)))


def build(seed, kind=None):
    """A table that exports; the kinds take turns over the seeds."""
    rng = random.Random("table %d" % seed)
    kind = kind or list(KINDS)[seed % len(KINDS)]
    count = record_count(rng)
    if rng.random() < 0.15:
        make = [KINDS[rng.choice(list(KINDS))] for _ in range(count)]
    else:
        make = [KINDS[kind]] * count
    return table_of(rng, kind, [tamed(one(rng)) for one in make])


# --------------------------------------------------------- failing tables

def with_record(rng, bad):
    """A bad record somewhere among good ones."""
    records = [tamed(KINDS["plain"](rng)) for _ in range(rng.randint(0, 4))]
    records.insert(rng.randint(0, len(records)), bad)
    offsets = [model.DATA_HEAD_SIZE + model.RECORD_SIZE * i
               for i in range(len(records))]
    data = data_head(rng) + b"".join(records)
    return named(rng, index_file(rng, offsets), data)


def lonely_mark(rng):
    bad = bytearray(KINDS["quiet"](rng))
    text = rng.choice((b"\xfd", b"\xfd 12", b"\x80 \xfd\x81", b"ab\xfd",
                       b"\xfd.\xfeab", b"ab\r\n\xfd\r\ncd"))
    at = model.TEXT_AT + model.TEXT_WIDTH * rng.randrange(9)
    bad[at:at + len(text) + 1] = text + b"\0"
    return with_record(rng, bytes(bad))


def bad_date(rng):
    bad = bytearray(KINDS["quiet"](rng))
    days = rng.choice((-1, -32768, -1461, model.LAST_DAY + 1, 32767))
    struct.pack_into("<h", bad, model.DATES_AT + 2 * rng.randrange(12), days)
    return with_record(rng, bytes(bad))


def bad_offset(rng):
    data = data_head(rng) + tamed(KINDS["plain"](rng))
    offset = rng.choice((-2, -55, -0x80000000))
    offsets = [55] * rng.randrange(3) + [offset] + [55] * rng.randrange(3)
    return named(rng, index_file(rng, offsets), data)


def empty_index(rng):
    data = data_head(rng) + tamed(KINDS["plain"](rng))
    count = rng.choice((0, -1, -32768))
    return named(rng, index_file(rng, [55] * rng.randrange(2), count), data)


def no_index(rng):
    data = data_head(rng) + tamed(KINDS["plain"](rng))
    return {rng.choice(("D4WVTX", "R9QVTX")) + ".BIN": data}


def bad_index(rng):
    data = data_head(rng) + tamed(KINDS["plain"](rng))
    index = rng.choice((
        index_file(rng, [55, 55], 1), index_file(rng, [55], 2),
        index_file(rng, [55])[:-1], index_file(rng, [55], 32767),
        index_file(rng, [55], magic=4321502), b"", b"\xdd\xf0\x41\x00\x01"))
    return named(rng, index, data)


def bad_data(rng):
    data = data_head(rng) + tamed(KINDS["plain"](rng))
    cut = rng.choice((0, 9, 54, 55, 56, 55 + 1258))
    files = named(rng, index_file(rng, [55]), data[:cut])
    if rng.random() < 0.2:
        files = {name: content for name, content in files.items()
                 if name.upper().endswith(".IDX")}
    return files


def bad_head(rng):
    head = rng.choice((data_head(rng, b"100"), data_head(rng, b""),
                       data_head(rng, b"101x"), data_head(rng, b"099"),
                       data_head(rng, b"2147483648"),
                       data_head(rng, name=b"R9QVTZ"),
                       data_head(rng, name=b"r9qvtx"),
                       data_head(rng, b"7" * 48)))
    data = head + tamed(KINDS["plain"](rng))
    return named(rng, index_file(rng, [55]), data)


FAILING = {"lonely mark": lonely_mark, "bad date": bad_date,
           "bad offset": bad_offset, "empty index": empty_index,
           "no index": no_index, "bad index": bad_index,
           "bad data": bad_data, "bad head": bad_head}


def build_failing(seed):
    """A table on which the program fails; the kinds take turns."""
    rng = random.Random("failing table %d" % seed)
    kind = list(FAILING)[seed % len(FAILING)]
    table = Table(kind, FAILING[kind](rng))
    if table.outcome.kind == "csv":
        raise AssertionError("table %d (%s) does not fail" % (seed, kind))
    return table


# ------------------------------------------------------------- full table

ISSUERS = 900
FULL_COUNT = 32767
TRADE_WORDS = ("בנק קרן השקעות תעשיות נכסים ביטוח אחזקות מסחר כימיקלים מזון "
               "תקשורת אנרגיה בניה תוכנה אופציה פיתוח יזמות שיווק").split()


def visual_name(words):
    """Hebrew words (in reading order) and figures as a screen shows them:
    the line from right to left, letters reversed, figures kept."""
    return b" ".join(word[::-1] if word[0] >= 128 else word
                     for word in reversed(words))[:40]


def dos_word(word):
    """A Hebrew word of this source in reading order, code page 862."""
    return bytes(ord(letter) - 0x5D0 + 128 for letter in word)


def issuer_words(rng):
    """A made-up name, mostly beside a word or two of the trade."""
    name = bytes(128 + rng.randrange(27) for _ in range(rng.randint(3, 6)))
    trade = rng.sample(TRADE_WORDS, rng.choice((0, 1, 1, 2)))
    return [dos_word(word) for word in trade] + [name]


def issuer_names(rng):
    """(Hebrew words in reading order, English name) of each issuer."""
    names = []
    for _ in range(ISSUERS):
        english = b" ".join(latin_word(rng).upper()
                            for _ in range(rng.randint(1, 3)))
        names.append((issuer_words(rng), english))
    return names


def security_words(rng, words):
    """What a security adds to its issuer's name: series, year, rate."""
    pick = rng.randrange(5)
    if pick == 0:
        return words
    if pick == 1:
        return words + [b"\x80\x82\x87", b"%d" % rng.randint(1, 40)]
    if pick == 2:
        return words + [b"%.2f%%" % rng.uniform(0.5, 9)]
    if pick == 3:
        return words + [b"(%d)" % rng.randint(1, 9), b"\x90\x92"]
    return words + [b"%02d/%02d" % (rng.randint(1, 12), rng.randint(6, 19))]


def isin(rng, number):
    return b"IL00%07d%d" % (number, rng.randrange(10))


def word_pool(rng, make, size=2048):
    return [model.encode(make(rng)) for _ in range(size)]


def full_pools(rng):
    """A pool of ready words for each of the 53 decimals but the code."""
    makers = (lambda r: round(r.uniform(1, 9000), 2),           # prices
              lambda r: round(r.gauss(0, 2), 2),                # changes
              lambda r: float(int(r.lognormvariate(9, 3))),     # turnovers
              lambda r: round(r.uniform(0, 12), 4),             # yields
              lambda r: round(r.lognormvariate(16, 2)),         # capital
              lambda r: round(r.uniform(0, 1.2), 6),            # ratios
              lambda r: r.choice((0.0, 0.0, 0.0, 1.0, 100.0)))  # flags
    return [word_pool(rng, makers[n % len(makers)]) for n in range(52)]


def full_fields(rng, number, issuer):
    words, english = issuer
    branch = rng.choice((b"\x81\x90\x97", b"\x9a\x99\x82", b"\x8c\x83\x91"))
    texts = (visual_name(security_words(rng, words)), b"%d" % number,
             isin(rng, number), english, b"%s.TA" % english[:4],
             b"%s %s" % (branch, b"12,500"), rng.choice((b"ILS", b"USD")),
             b"" if rng.random() < 0.4 else visual_name(words + [b"\"\x8e"]),
             b"TASE, main list" if rng.random() < 0.7 else b"")
    return [text.ljust(model.TEXT_WIDTH, b"\0") for text in texts]


def full_record(rng, number, issuer, pools):
    words = [number << 1] + [rng.choice(pool) for pool in pools]
    today = 14300
    days = [today - int(rng.random() * 3000) for _ in range(9)]
    days += [today + int(rng.random() * 5000), today, 0]
    kind = rng.choice((0, 0, 0, 0, 1, 2))
    return pack_record(kind, full_fields(rng, number, issuer), words, days)


def build_full(seed):
    """As many records as an index can hold, in a realistic mix."""
    rng = random.Random("full table %d" % seed)
    issuers, pools = issuer_names(rng), full_pools(rng)
    numbers = rng.sample(range(100000, 9999999), FULL_COUNT)
    records = [full_record(rng, number, rng.choice(issuers), pools)
               for number in numbers]
    entries = [struct.pack("<16sii", rng.choice(issuers)[1][:15], number,
                           model.DATA_HEAD_SIZE + model.RECORD_SIZE * i)
               for i, number in enumerate(numbers)]
    index = struct.pack("<Ih", model.INDEX_MAGIC, FULL_COUNT)
    return {"D4WVTX.IDX": index + b"".join(entries),
            "D4WVTX.BIN": data_head(rng) + b"".join(records)}


# ----------------------------------------------------------- command line

def parse_arguments():
    parser = argparse.ArgumentParser(
        description="Builds tables of securities.")
    parser.add_argument("what", choices=("full", "make"))
    parser.add_argument("directory")
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--failing", action="store_true")
    parser.add_argument("--csv", action="store_true")
    return parser.parse_args()


class FullTable:
    """Files only: what the model makes of them takes a while to say."""

    def __init__(self, seed):
        self.kind, self.files = "full", build_full(seed)

    @property
    def outcome(self):
        return model.export(self.files)


def main():
    arguments = parse_arguments()
    if arguments.what == "full":
        table = FullTable(arguments.seed)
    else:
        maker = build_failing if arguments.failing else build
        table = maker(arguments.seed)
    write_files(table, arguments.directory)
    if arguments.csv and table.outcome.kind == "csv":
        path = os.path.join(arguments.directory, "expected.csv")
        with open(path, "wb") as file:
            file.write(table.outcome.data)
    print("%s table in %s" % (table.kind, arguments.directory))


if __name__ == "__main__":
    main()
