"""Makes the seeds of every fuzz target from the committed ones and from the example records.

    seeds.py OUT        writes OUT/TARGET/*

A seed is a text file, of which the last line feed is cut off, or bytes in hexadecimal with remarks (`.hex`). Targets whose
input opens with the sizes of the pieces that its text is cut into get four bytes of such a head in front."""

import json
import sys
from pathlib import Path

ROOT = Path(__file__).resolve().parents[1]
SEEDS = ROOT / "fuzz/seeds"

# The folders of seeds that a target takes; "examples" stands for one example record of each struct.
SOURCES = {
    "any_dict": ("any_dict",),
    "base64": ("base64",),
    "binary_message": ("binary_message",),
    "binary_record": ("binary_record",),
    "hand_parser": ("json", "examples"),
    "lazy_body": ("json", "binary_record", "examples"),
    "message": ("message",),
    "packetizer": ("message",),
    "readers_agree": ("json", "examples"),
    "stream_parser": ("json", "stream_parser", "examples"),
    "typed_reader_memory": ("json", "examples"),
    "typed_reader_stream": ("json", "examples"),
}

# Sizes 1 to 32, by the low five bits; the last reads nearly all at once.
HEADS = (b"@ABC", b"AAAA", b"_@GO", b"\xff\xff\xff\xff")
WITH_HEAD = ("lazy_body", "packetizer", "stream_parser", "typed_reader_stream")


def example_seeds():
    """One record of each struct that the examples have: the shortest."""
    records = {}
    for file in sorted((ROOT / "examples/data").glob("*.jsonl")):
        for line in file.read_text(encoding="utf-8").splitlines():
            name = json.loads(line)["type"]
            if name not in records or len(line) < len(records[name]):
                records[name] = line
    return [(name, text.encode()) for name, text in sorted(records.items())]


def folder_seeds(folder):
    seeds = []
    for file in sorted((SEEDS / folder).iterdir()):
        data = file.read_bytes()
        if file.suffix == ".hex":
            lines = data.decode().splitlines()
            data = bytes.fromhex(" ".join(line.partition("#")[0] for line in lines))
        else:
            data = data.removesuffix(b"\n")
        seeds.append((file.stem, data))
    return seeds


def seeds_of(target):
    for source in SOURCES[target]:
        seeds = example_seeds() if source == "examples" else folder_seeds(source)
        for number, (name, data) in enumerate(seeds):
            head = HEADS[number % len(HEADS)] if target in WITH_HEAD else b""
            yield f"{source}-{name}", head + data


def main(out):
    for target in SOURCES:
        folder = Path(out) / target
        folder.mkdir(parents=True, exist_ok=True)
        for old in folder.iterdir():
            old.unlink()
        for name, data in seeds_of(target):
            (folder / name).write_bytes(data)


if __name__ == "__main__":
    if len(sys.argv) != 2:
        sys.exit(__doc__)
    main(sys.argv[1])
