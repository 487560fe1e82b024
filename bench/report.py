#!/usr/bin/env python3
"""Prints a table of rates and ratios from the JSON output of the benchmark programs.

Benchmarks are named WORK/DATA/LIBRARY. A rate is the median of the repetitions; a ratio is ours to the peer's.
"""
import json
import statistics
import sys

OURS = "sorn"
DATA = ["examples", "5 KiB", "500 KiB", "5 MiB"]


def read_rates(paths):
    """{(work, data): {library: [bytes per second, ...]}}, in the order of the files."""
    rates = {}
    for path in paths:
        with open(path, encoding="utf-8") as file:
            runs = json.load(file)["benchmarks"]
        for run in runs:
            if run.get("error_occurred"):
                sys.exit(f"{run['name']}: {run['error_message']}")
            if run["run_type"] != "iteration":
                continue
            work, data, library = run["run_name"].split("/")
            rates.setdefault((work, data), {}).setdefault(library, []).append(run["bytes_per_second"])
    return rates


def main():
    if len(sys.argv) < 2:
        sys.exit("usage: report.py OUTPUT.json...")
    rates = read_rates(sys.argv[1:])
    print(f"{'work':<14}{'data':<10}{'library':<16}{'MB/s':>9}{'ours : it':>11}")
    for (work, data), libraries in sorted(rates.items(), key=lambda item: (item[0][0], DATA.index(item[0][1]))):
        medians = {library: statistics.median(values) for library, values in libraries.items()}
        for library, rate in sorted(medians.items(), key=lambda item: (item[0] != OURS, item[0])):
            ratio = "" if library == OURS else f"{medians[OURS] / rate:.2f}"
            print(f"{work:<14}{data:<10}{library:<16}{rate / 1e6:>9.1f}{ratio:>11}")
    for work in sorted({work for work, _ in rates}):
        flat = flatness(rates, work)
        if flat is not None:
            print(f"{work}: cost per byte at 5 MiB against 5 KiB, ours: {flat:.2f}")


def flatness(rates, work):
    small = rates.get((work, "5 KiB"), {}).get(OURS)
    large = rates.get((work, "5 MiB"), {}).get(OURS)
    if not small or not large:
        return None
    return statistics.median(small) / statistics.median(large)


if __name__ == "__main__":
    main()
