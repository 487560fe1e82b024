"""Lists the headers that an installed package has: those that applications are meant to include, and all that these include.

usage: public_headers.py DIRECTORY...   the include roots; prints "ROOT<tab>PATH UNDER IT" lines
"""

import re
import sys
from pathlib import Path

PUBLIC = [
    "sorn/sorn.h",
    "client/BusTypeLibrary.h",
    "vkbus/LqxIpc.h",
    "vkbus/VkBus.h",
    *(f"kelbaselib/{name}.h" for name in ("ByteCountingBytesink", "Bytesink", "Bytesource", "InMemoryBytesource", "InMemoryBytestream")),
    *(f"rox/{name}.h" for name in (
        "RoxActivity", "RoxArray", "RoxByteString", "RoxCore", "RoxCoreSemaphore", "RoxFd", "RoxFeatures", "RoxGenericIntArray",
        "RoxHashIntToCore", "RoxHashIntToPointer", "RoxInitInfo", "RoxLogger", "RoxMempool", "RoxMonotonicTime", "RoxMutexHold", "RoxSpinLockHold",
        "RoxString", "RoxStringArray", "RoxThread", "RoxTime", "VkCast", "VkFeature", "ref")),
    *(f"sorn/model/{name}.h" for name in ("ChannelNumber", "Currency", "Date", "DateTime", "Time")),
]
INCLUDE = re.compile(r'^\s*#\s*include\s+"([^"]+)"', re.MULTILINE)


def find(roots, path):
    return next((root for root in roots if (root / path).is_file()), None)


def main():
    roots = [Path(root) for root in sys.argv[1:]]
    found = {}
    due = list(PUBLIC)
    while due:
        path = due.pop()
        if path in found or path.startswith("sornschema/"):  # which is installed as a whole
            continue
        found[path] = find(roots, path)
        if found[path] is None:
            sys.exit(f"{path}: no such header")
        due += INCLUDE.findall((found[path] / path).read_text(encoding="utf-8"))
    for path, root in sorted(found.items()):
        print(f"{root}\t{path}")


if __name__ == "__main__":
    main()
