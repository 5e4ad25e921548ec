#!/usr/bin/env python3
"""Random property lists, always the same for a seed, written and checked with Python's plistlib.

    plistlib_documents.py write SEED COUNT FILE    puts COUNT documents in both forms into FILE
    plistlib_documents.py check SEED COUNT FILE    fails unless FILE holds equal documents in the same forms

A file is a sequence of documents, each after its length in four bytes. Every second one is in the binary form.
"""

import datetime
import plistlib
import random
import struct
import sys

FORMS = (plistlib.FMT_XML, plistlib.FMT_BINARY)
ALPHABETS = (
    "abcdefghijklmnopqrstuvwxyz0123456789.-_ ",
    "<>&\"'\t\n ]]>abc",
    "äöüßéñçøåæ ΑΒΓαβγ кирилл",
    "旅行音楽図書館「」，。",
    "😀🎈🚀𝔘𐍈 a",
    "\ufffd\ue000\ud7ff\u0080\u07ff\u0800",
)
# What only the binary form keeps.
CONTROLS = "\r\x01\x1f\x7f\x00\ufffe\uffff"
EDGES = (0, 1, 127, 128, 255, 256, 32767, 32768, 65535, 65536, 2**31, 2**32 - 1, 2**32, 2**63 - 1, 2**63, 2**64 - 1)
# About as many values a document has at most.
MOST_VALUES = 30
EPOCH = datetime.datetime(2001, 1, 1)


class Documents:
    def __init__(self, seed, form):
        self.random = random.Random(f"{seed} {form}")
        self.binary = form == plistlib.FMT_BINARY

    def text(self):
        alphabet = self.random.choice(ALPHABETS)
        if self.binary and self.random.random() < 0.1:
            alphabet += CONTROLS
        length = self.random.choice((0, 1, 5, 14, 15, 16, 29, 30, 31, 40, 100))
        return "".join(self.random.choice(alphabet) for _ in range(self.random.randint(0, length)))

    def integer(self):
        if self.random.random() < 0.5:
            return self.edge()
        return self.random.randint(-(2**63), 2**64 - 1) >> self.random.randint(0, 63)

    def edge(self):
        number = self.random.choice(EDGES)
        return -number if self.random.random() < 0.5 and number < 2**63 else number

    def real(self):
        # No -0.0 beside 0.0: plistlib stores them as one object.
        special = (0.0, 1.5, -2.25, 1e300, 5e-324, 1e16, float("inf"), float("-inf"), 0.1, 1 / 3)
        if self.random.random() < 0.5:
            return self.random.choice(special)
        return self.random.uniform(-1, 1) * 10 ** self.random.randint(-300, 300)

    def date(self):
        moment = datetime.datetime.min + datetime.timedelta(seconds=self.random.randint(0, 315537897599))
        near = EPOCH + datetime.timedelta(seconds=self.random.randint(-(10**9), 10**9))
        if self.binary and self.random.random() < 0.3:
            return near + datetime.timedelta(microseconds=self.random.choice((500000, 250000, 125000)))
        return self.random.choice((moment, near))

    def data(self):
        return self.random.randbytes(self.random.choice((0, 1, 2, 3, 14, 15, 56, 57, 58, 255, 256)))

    def scalar(self):
        makers = [self.text, self.text, self.integer, self.real, self.date, self.data]
        makers.append(lambda: self.random.random() < 0.5)
        if self.binary:
            makers.append(lambda: plistlib.UID(self.random.choice(EDGES)))
        return self.random.choice(makers)()

    def document(self):
        self.left = MOST_VALUES
        return self.value()

    def value(self, depth=0):
        self.left -= 1
        kind = self.random.random() if self.left > 0 else 1
        size = self.random.choice((0, 1, 3, 6, 14, 15, 16, 40)) if depth < 2 else self.random.randint(0, 3)
        if depth < 5 and kind < 0.25:
            return [self.value(depth + 1) for _ in range(size)]
        if depth < 5 and kind < 0.55:
            return {self.text(): self.value(depth + 1) for _ in range(size)}
        if depth < 4 and kind < 0.65:
            keys = [self.text() for _ in range(4)]
            return [{key: self.scalar() for key in keys} for _ in range(size)]
        return self.scalar()


def documents(seed, count):
    """Yields COUNT pairs of a form and a value."""
    makers = [(form, Documents(seed, form)) for form in FORMS]
    for number in range(count):
        form, maker = makers[number % 2]
        yield form, maker.document()


def write(seed, count, path):
    shuffle = random.Random(seed)
    with open(path, "wb") as file:
        for form, value in documents(seed, count):
            encoded = plistlib.dumps(value, fmt=form, sort_keys=shuffle.random() < 0.7)
            file.write(struct.pack(">I", len(encoded)) + encoded)


def difference(one, other, path="document"):
    """Where two values differ, or None. Like ==, but neither 1 == 1.0 nor 1 == True nor 0.0 == -0.0."""
    if type(one) is type(other) is dict and one.keys() == other.keys():
        parts = [(one[key], other[key], f"{path}[{key!r}]") for key in one]
    elif type(one) is type(other) is list and len(one) == len(other):
        parts = [(*pair, f"{path}[{place}]") for place, pair in enumerate(zip(one, other))]
    elif type(one) is type(other) and repr(one) == repr(other):
        return None
    else:
        return f"{path}: {one!r:.200} and {other!r:.200}"
    return next(filter(None, (difference(*part) for part in parts)), None)


def check(seed, count, path):
    with open(path, "rb") as file:
        for number, (form, value) in enumerate(documents(seed, count)):
            (length,) = struct.unpack(">I", file.read(4))
            encoded = file.read(length)
            if encoded.startswith(b"bplist") != (form == plistlib.FMT_BINARY):
                sys.exit(f"document {number} is in the wrong form")
            found = difference(plistlib.loads(encoded), value)
            if found:
                sys.exit(f"document {number} differs: {found}")
        if file.read(1):
            sys.exit("there are more documents than were written")


def main():
    if len(sys.argv) != 5 or sys.argv[1] not in ("write", "check"):
        sys.exit(__doc__)
    action = {"write": write, "check": check}[sys.argv[1]]
    action(int(sys.argv[2]), int(sys.argv[3]), sys.argv[4])


if __name__ == "__main__":
    main()
