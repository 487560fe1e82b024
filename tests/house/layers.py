"""The layers of the project and a checker of the includes between them.

A file may include headers of its own layer and of the layers named below it; a source file never is included. Every
folder with C++ sources belongs to a layer, so a new folder has to be put into the table."""

import re
from pathlib import Path
from typing import NamedTuple

SORN = "core/common/lib/sorn"


class Layer(NamedTuple):
    folder: str  # relative to the root; the files right in it
    prefix: str  # what its headers' include paths begin with
    below: tuple  # names of the layers that it may include


PLATFORM = ("rox", "kelbaselib")
LIBRARY = PLATFORM + ("model", "sornschema", "dict", "json", "convert", "binary", "typedjson", "lazy", "rpc")
TESTS_OF_LIBRARY = ("model", "schema", "dict", "json", "convert", "binary", "typedjson", "lazy", "rpc", "pairs", "peer")

# A layer stands behind all layers that it may include.
LAYERS = {
    "rox": Layer("platform/rox", "rox", ()),
    "kelbaselib": Layer("platform/kelbaselib", "kelbaselib", ("rox",)),
    "model": Layer(f"{SORN}/model", "sorn/model", ("rox",)),
    "vkbus": Layer("platform/vkbus", "vkbus", ("rox",)),
    # The generator's output, in the build folder: records know the layers above by forward declarations only.
    "sornschema": Layer("sornschema", "sornschema", ("rox", "model")),
    "dict": Layer(f"{SORN}/dict", "sorn/dict", PLATFORM + ("model",)),
    "json": Layer(f"{SORN}/json", "sorn/json", PLATFORM + ("model", "dict")),
    "convert": Layer(f"{SORN}/convert", "sorn/convert", PLATFORM + ("model", "dict")),
    "binary": Layer(f"{SORN}/binary", "sorn/binary", PLATFORM + ("model", "dict", "convert")),
    "typedjson": Layer(f"{SORN}/typedjson", "sorn/typedjson", PLATFORM + ("model", "dict", "json", "convert")),
    "lazy": Layer(
        f"{SORN}/lazy", "sorn/lazy", PLATFORM + ("model", "sornschema", "dict", "json", "convert", "binary", "typedjson")
    ),
    "rpc": Layer(
        f"{SORN}/rpc", "sorn/rpc", PLATFORM + ("model", "sornschema", "dict", "json", "convert", "binary", "lazy")
    ),
    "client": Layer("client", "client", LIBRARY + ("vkbus",)),
    "sorn": Layer(SORN, "sorn", LIBRARY + ("vkbus", "client")),  # sorn.h, the header of all
    "service": Layer("service", "service", LIBRARY + ("vkbus", "client")),
    "tools": Layer("tools", "tools", LIBRARY + ("sorn", "vkbus", "client", "service")),
    "bench": Layer("bench", "bench", LIBRARY + ("sorn",)),
    "bench/common": Layer("bench/common", "common", ()),
    **{
        f"bench/{name}": Layer(f"bench/{name}", name, LIBRARY + ("sorn", "bench/common"))
        for name in ("text", "codecs", "messages", "instructions")
    },
    "bench/bus": Layer("bench/bus", "bus", LIBRARY + ("sorn", "vkbus", "client", "bench/common")),
    "fuzz/support": Layer("fuzz/support", "fuzz/support", LIBRARY + ("sorn",)),
    "fuzz": Layer("fuzz", "fuzz", LIBRARY + ("sorn", "fuzz/support")),
    "examples": Layer("examples", "examples", LIBRARY + ("sorn", "vkbus", "client")),
    "tests/support": Layer("tests/support", "support", ()),
    # The tests of a platform library stand without the rest; those of libsorn.so link all of it, and may use fixtures of
    # the tests that stand before them.
    "tests/rox": Layer("tests/rox", "rox_test", ("rox", "tests/support")),
    "tests/kelbaselib": Layer("tests/kelbaselib", "kelbaselib_test", PLATFORM + ("tests/support",)),
    "tests/service": Layer("tests/service", "service_test", LIBRARY + ("vkbus", "client", "service", "tests/support")),
    "tests/vkbus": Layer("tests/vkbus", "vkbus_test", ("rox", "vkbus", "client", "tests/support")),
    "tests/client": Layer("tests/client", "client_test", LIBRARY + ("sorn", "vkbus", "client", "tests/support")),
    "tests/package": Layer("tests/package", "package_test", LIBRARY + ("sorn",)),
    "tests/client_bus": Layer(
        "tests/client_bus", "client_bus_test", LIBRARY + ("sorn", "vkbus", "client", "tests/support", "tests/client")
    ),
    **{
        f"tests/{name}": Layer(
            f"tests/{name}",
            name,
            LIBRARY + ("sorn", "tests/support") + tuple(f"tests/{each}" for each in TESTS_OF_LIBRARY[:number]),
        )
        for number, name in enumerate(TESTS_OF_LIBRARY)
    },
}

# The one knot: dynamic values hold lazy bodies, and lazy bodies convert to dynamic values. Below the lazy layer only this
# header names the class, by a forward declaration; records hold references on it, too.
KNOT = f"{SORN}/dict/LazyBody.h"
KNOT_CLASS = "LazyDict"
KNOT_FREE = ("dict", "json", "convert", "binary", "typedjson")

SUFFIXES = (".h", ".cpp", ".cc", ".hpp", ".inc")
INCLUDE = re.compile(r'^\s*#\s*include\s*([<"])([^">]+)[">]', re.MULTILINE)


def layer_of_folder(folder):
    return next((name for name, layer in LAYERS.items() if layer.folder == folder), None)


def layer_of_include(bracket, path, own):
    """The layer that a header belongs to; None for one from outside the project, "" for one that fits nowhere."""
    prefix, _, name = path.rpartition("/")
    if bracket == '"' and not prefix:
        return own  # beside the including file
    found = next((layer for layer, (_, each, _) in LAYERS.items() if each == prefix), None)
    if found is None and (bracket == '"' or prefix.split("/")[0] in ("sorn", "rox", "kelbaselib", "vkbus")):
        return ""
    return found


def check_text(layer, file, text):
    """Complaints about one file of a layer."""
    complaints = []
    for match in INCLUDE.finditer(text):
        bracket, path = match.groups()
        line = text.count("\n", 0, match.start(1)) + 1
        target = layer_of_include(bracket, path, layer)
        if path.endswith((".cpp", ".cc")):
            complaints.append(f"{file}:{line}: includes the source file {path}")
        elif target == "":
            complaints.append(f"{file}:{line}: {path} lies in no layer")
        elif target is not None and target != layer and target not in LAYERS[layer].below:
            complaints.append(f"{file}:{line}: {layer} must not include {path} of {target}")
    if layer in KNOT_FREE and file != KNOT and re.search(rf"^\s*class {KNOT_CLASS};", text, re.MULTILINE):
        complaints.append(f"{file}: only {KNOT} declares {KNOT_CLASS} below the lazy layer; include it")
    return complaints


def check_tree(root):
    """Complaints about all C++ files under a folder, build folders and hidden ones left out."""
    root = Path(root)
    complaints = []
    for path in sorted(each for suffix in SUFFIXES for each in root.rglob(f"*{suffix}")):
        file = path.relative_to(root)
        if file.parts[0] == "build" or any(part.startswith(".") for part in file.parts):
            continue
        layer = layer_of_folder(file.parent.as_posix())
        if layer is None:
            complaints.append(f"{file}: lies in no layer; put its folder into {Path(__file__).name}")
            continue
        complaints += check_text(layer, file.as_posix(), path.read_text(encoding="utf-8"))
    return complaints
