#!/usr/bin/env python3
"""Times Python's plistlib on the documents that PropertyListBench put into FOLDER.

    plistlib_peer.py FOLDER > peer.json

Prints what Google Benchmark prints, so that bench/table.py reads both.
"""

import json
import pathlib
import plistlib
import sys
import time

ROUNDS = 5
FORMS = {"binary": plistlib.FMT_BINARY, "xml": plistlib.FMT_XML}


def best_of(action):
    """The least real time and the least processor time, in seconds."""
    rounds = []
    for _ in range(ROUNDS):
        start = time.perf_counter(), time.process_time()
        action()
        rounds.append((time.perf_counter() - start[0], time.process_time() - start[1]))
    return tuple(map(min, zip(*rounds)))


def row(name, seconds):
    real, cpu = seconds
    return {"name": name, "run_type": "iteration", "real_time": real * 1e6, "cpu_time": cpu * 1e6, "time_unit": "us"}


def measure(corpus):
    for name, form in FORMS.items():
        files = [path.read_bytes() for path in sorted((corpus / name).iterdir())]
        values = [plistlib.loads(file) for file in files]
        yield row(f"plistlib/parse/{corpus.name}/{name}", best_of(lambda: [plistlib.loads(file) for file in files]))
        yield row(
            f"plistlib/serialise/{corpus.name}/{name}",
            best_of(lambda: [plistlib.dumps(value, fmt=form) for value in values]),
        )


def main():
    if len(sys.argv) != 2:
        sys.exit(__doc__)
    corpora = sorted(path for path in pathlib.Path(sys.argv[1]).iterdir() if path.is_dir())
    json.dump({"benchmarks": [figure for corpus in corpora for figure in measure(corpus)]}, sys.stdout, indent=1)


if __name__ == "__main__":
    main()
