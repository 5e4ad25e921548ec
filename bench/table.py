#!/usr/bin/env python3
"""Sets benchmark results against what bench/figures.txt demands.

    table.py [--partial] RESULTS.json...

RESULTS.json are what Google Benchmark, or a peer that prints the same, wrote. Of several repetitions the fastest counts
by the processor's time and the middle one by the clock's, where a disk has its lucky moments.
Exits with 1 when a figure is missed or, without --partial, was not measured.
"""

import json
import pathlib
import statistics
import sys

FIGURES = pathlib.Path(__file__).with_name("figures.txt")
MICROSECONDS = {"ns": 1e-3, "us": 1, "ms": 1e3, "s": 1e6}
COLUMNS = "{:<42} {:>12} {:<42} {:>12} {:>8} {:>12}  {}"


def figures():
    for line in FIGURES.read_text().splitlines():
        if line.strip() and not line.startswith("#"):
            name, relation, ratio, other, clock = line.split()
            yield name, relation, float(ratio), other, clock


def times(paths):
    """The time of each benchmark by each clock, in microseconds."""
    all_times = {}
    for path in paths:
        for result in json.loads(pathlib.Path(path).read_text())["benchmarks"]:
            if result.get("run_type") == "aggregate" or result.get("error_occurred"):
                continue
            name = result.get("run_name", result["name"])
            for clock in ("cpu", "real"):
                time = result[clock + "_time"] * MICROSECONDS[result["time_unit"]]
                all_times.setdefault((name, clock), []).append(time)
    return {key: min(found) if key[1] == "cpu" else statistics.median(found) for key, found in all_times.items()}


def judge(relation, required, ours, theirs):
    """The ratio that counts, and whether it is good enough."""
    if relation == "below":
        return ours * 1000, ours * 1000 <= required
    if relation == "faster":
        return theirs / ours, theirs / ours >= required
    return ours / theirs, ours / theirs <= required


def main():
    arguments = sys.argv[1:]
    partial = "--partial" in arguments
    paths = [argument for argument in arguments if not argument.startswith("--")]
    if not paths:
        sys.exit(__doc__)
    measured = times(paths)
    missed = False
    print(COLUMNS.format("benchmark", "ours us", "peer or floor", "us", "ratio", "required", ""))
    for name, relation, required, other, clock in figures():
        ours = measured.get((name, clock))
        theirs = 0 if other == "-" else measured.get((other, clock))
        if ours is None or theirs is None:
            missed |= not partial
            print(COLUMNS.format(name, "-", other, "-", "-", f"{relation} {required:g}", "not measured"))
            continue
        ratio, ok = judge(relation, required, ours, theirs)
        missed |= not ok
        row = (f"{ours:.4g}", other, f"{theirs:.4g}", f"{ratio:.2f}", f"{relation} {required:g}", "ok" if ok else "MISSED")
        print(COLUMNS.format(name, *row))
    sys.exit(1 if missed else 0)


if __name__ == "__main__":
    main()
