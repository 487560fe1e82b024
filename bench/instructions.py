#!/usr/bin/env python3
"""Counts the instructions per byte of each codec at two sizes, on realistic data and on shapes made to hurt.

usage: instructions.py [--small N] [--large N] [--jobs N] [--only TEXT] [--json FILE] [--limit RATIO] PROGRAM

PROGRAM is the built codec_work; valgrind's callgrind counts, so the figures are exact and do not depend on the machine's
load. Exit code 1 when the cost per byte at the large size is above the limit times that at the small one.
"""
import argparse
import concurrent.futures
import json
import os
import re
import subprocess
import sys
import tempfile

SHAPES = ["realistic", "string", "deep", "keys", "objects", "arrays", "blanks", "colliding"]
TEXT_CODECS = ["dictionary-in", "stream-in", "typed-in", "typed-stream-in"]
OTHER_CODECS = ["dictionary-out", "to-object", "to-dictionary", "typed-out", "binary-out", "binary-in"]
# Blanks are gone behind the first reader, and Base64 sees only bytes.
CASES = [(shape, codec) for shape in SHAPES for codec in TEXT_CODECS + ([] if shape == "blanks" else OTHER_CODECS)]
CASES += [("realistic", "base64-out"), ("realistic", "base64-in")]


def per_byte(program, shape, codec, size):
    """Instructions per byte of one run."""
    with tempfile.TemporaryDirectory() as folder:
        run = subprocess.run(
            ["valgrind", "--tool=callgrind", "--instr-atstart=no", f"--callgrind-out-file={folder}/out", program, shape,
             codec, str(size)],
            capture_output=True, text=True, env={**os.environ, "LD_BIND_NOW": "1"})
        if run.returncode != 0:
            raise RuntimeError(f"{shape} {codec} {size}: {run.stderr[-400:]}")
        with open(f"{folder}/out", encoding="utf-8") as file:
            counted = re.search(r"^totals: (\d+)", file.read(), re.MULTILINE)
    return int(counted.group(1)) / int(run.stdout)


def measure(options, shape, codec):
    small, large = (per_byte(options.program, shape, codec, size) for size in (options.small, options.large))
    return {"shape": shape, "codec": codec, "small": small, "large": large, "ratio": large / small}


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--small", type=int, default=5 << 10, help="bytes (default: 5 KiB)")
    parser.add_argument("--large", type=int, default=5 << 20, help="bytes (default: 5 MiB)")
    parser.add_argument("--jobs", type=int, default=os.cpu_count())
    parser.add_argument("--only", default="", metavar="TEXT", help="only cases with this in `SHAPE CODEC`")
    parser.add_argument("--json", metavar="FILE", help="write the figures there, too")
    parser.add_argument("--limit", type=float, default=1.25)
    parser.add_argument("program")
    options = parser.parse_args()
    cases = [case for case in CASES if options.only in " ".join(case)]
    print(f"instructions per byte at {options.small} and {options.large} bytes; limit of the ratio {options.limit}")
    print(f"{'shape':<12}{'codec':<18}{'small':>10}{'large':>10}{'ratio':>8}")
    results = []
    with concurrent.futures.ThreadPoolExecutor(options.jobs) as pool:
        for result in pool.map(lambda case: measure(options, *case), cases):
            results.append(result)
            mark = "" if result["ratio"] <= options.limit else "  above the limit"
            print(f"{result['shape']:<12}{result['codec']:<18}{result['small']:>10.1f}{result['large']:>10.1f}"
                  f"{result['ratio']:>8.2f}{mark}", flush=True)
    if options.json:
        with open(options.json, "w", encoding="utf-8") as file:
            json.dump({"small": options.small, "large": options.large, "limit": options.limit, "results": results}, file)
    return 1 if any(result["ratio"] > options.limit for result in results) else 0


if __name__ == "__main__":
    sys.exit(main())
