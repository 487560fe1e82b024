#!/usr/bin/env python3
"""Prints a table of rates and ratios from the JSON output of the benchmark programs, and draws the ratios.

usage: report.py [--svg FILE] [--instructions FILE] OUTPUT.json...

Benchmarks are named WORK/DATA/LIBRARY. A rate is the median of the repetitions; a ratio is ours to the peer's, and bigger
is better. The work "memory" has no rate but bytes, and there the smaller ratio is better. FILE of --instructions is what
instructions.py wrote.
"""
import argparse
import json
import statistics
import sys
from typing import NamedTuple

import chart

OURS = "sorn"
DATA = ["examples", "5 KiB", "500 KiB", "5 MiB", "64 KiB body", "cancel", "request", "response",
        "1 KiB", "1,000 streams"]
MEMORY = "memory"
WORKS = ["object to binary", "binary to object", "object to text", "text to object", "tree to text", "text to tree",
         "frame and unframe", "write message", "read message", "round trip", "response in a stream", MEMORY]
# The ratio that is wanted, by work and peer; of memory, the highest.
GOALS = {
    ("object to binary", "libprotobuf"): 1.5,
    ("binary to object", "libprotobuf"): 1.5,
    ("object to binary", "libprotobuf dynamic"): 4,
    ("binary to object", "libprotobuf dynamic"): 4,
    ("text to object", "RapidJSON"): 1.0,
    ("text to object", "libprotobuf"): 10,
    ("object to text", "RapidJSON"): 1.5,
    # Shown without a goal of their own.
    ("object to text", "libprotobuf"): None,
    ("object to binary", "libprotobuf oneof"): None,
    ("binary to object", "libprotobuf oneof"): None,
    (MEMORY, "libprotobuf oneof"): None,
    ("text to tree", "nlohmann-json"): 3,
    ("tree to text", "nlohmann-json"): 3,
    ("frame and unframe", "two copies"): 0.5,
    ("write message", "nlohmann-json"): 5,
    ("read message", "nlohmann-json"): 5,
    ("round trip", "gRPC"): 5,
    ("round trip", "bare socket"): 0.4,
    ("response in a stream", "one stream"): 0.5,
    (MEMORY, "libprotobuf"): 1.0,
}
# Where the data make a difference.
GOALS_OF_DATA = {("round trip", "5 MiB", "bare socket"): 0.5}


class Row(NamedTuple):
    work: str
    data: str
    library: str
    figure: float  # bytes per second; of memory, bytes
    ratio: float   # ours to this; None for ours
    goal: float    # or None
    times: tuple   # of single calls in microseconds: the 50th and the 99th percentile, processor time; or None

    @property
    def is_met(self):
        return self.ratio <= self.goal if self.work == MEMORY else self.ratio >= self.goal


def read_figures(paths):
    """{(work, data): {library: [(figure, p50, p99, processor time), ...]}}, in the order of the files; percentiles may be None."""
    figures = {}
    for path in paths:
        with open(path, encoding="utf-8") as file:
            runs = json.load(file)["benchmarks"]
        for run in runs:
            if run.get("error_occurred"):
                sys.exit(f"{run['name']}: {run['error_message']}")
            if run["run_type"] != "iteration":
                continue
            work, data, library = run["name"].split("/")[:3]
            figure = run["bytes"] if work == MEMORY else run["bytes_per_second"]
            figures.setdefault((work, data), {}).setdefault(library, []).append(
                (figure, run.get("p50"), run.get("p99"), run["cpu_time"] / 1e3))
    return figures


def rows_of(figures):
    rows = []
    for (work, data), libraries in sorted(figures.items(), key=lambda item: (WORKS.index(item[0][0]), DATA.index(item[0][1]))):
        medians = {library: statistics.median(figure for figure, *_ in runs) for library, runs in libraries.items()}
        for library, figure in sorted(medians.items(), key=lambda item: (item[0] != OURS, item[0])):
            ratio = None if library == OURS or OURS not in medians else medians[OURS] / figure
            goal = GOALS_OF_DATA.get((work, data, library), GOALS.get((work, library)))
            _, *times = zip(*libraries[library])
            rows.append(Row(work, data, library, figure, ratio, goal, None if None in times[0] else tuple(map(statistics.median, times))))
    return rows


def print_rows(rows):
    print(f"{'work':<22}{'data':<15}{'library':<21}{'MB/s':>11}{'ours : it':>11}{'goal':>7}")
    for row in rows:
        ratio = "" if row.ratio is None else f"{row.ratio:.2f}"
        goal = ""
        if row.goal is not None and row.ratio is not None:
            goal = f"{row.goal:g}".rjust(7) + ("  met" if row.is_met else "  not met")
        figure = f"{row.figure / 1e3:.1f} kB" if row.work == MEMORY else f"{row.figure / 1e6:.1f}"
        times = "" if row.times is None else "  p50 {:.1f} us, p99 {:.1f} us, processors {:.1f} us".format(*row.times)
        print(f"{row.work:<22}{row.data:<15}{row.library:<21}{figure:>11}{ratio:>11}{goal}{times}")


def print_flatness(path):
    with open(path, encoding="utf-8") as file:
        measured = json.load(file)
    print(f"\ninstructions per byte at {measured['large']} bytes to those at {measured['small']}, limit {measured['limit']}")
    for result in measured["results"]:
        verdict = "met" if result["ratio"] <= measured["limit"] else "not met"
        print(f"{result['shape']:<12}{result['codec']:<18}{result['ratio']:>6.2f}  {verdict}")


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--svg", metavar="FILE", help="draw the ratios there")
    parser.add_argument("--instructions", metavar="FILE")
    parser.add_argument("outputs", nargs="+", metavar="OUTPUT.json")
    options = parser.parse_args()
    rows = rows_of(read_figures(options.outputs))
    print_rows(rows)
    if options.instructions:
        print_flatness(options.instructions)
    if options.svg:
        groups = [chart.Group(f"{work}, against {library}", "at most" if work == MEMORY else "at least", goal,
                              [(row.data, row.ratio) for row in rows if (row.work, row.library) == (work, library)])
                  for (work, library), goal in sorted(GOALS.items(), key=lambda item: WORKS.index(item[0][0]))]
        with open(options.svg, "w", encoding="utf-8") as file:
            file.write(chart.svg("Speed, ours to the peer's in the same run", [g for g in groups if g.bars]))


if __name__ == "__main__":
    main()
