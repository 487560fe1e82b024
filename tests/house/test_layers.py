"""Includes go down only, through all files and the generator's output; and the checker sees what is wrong."""

import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

from house.layers import KNOT, LAYERS, SORN, check_tree

ROOT = Path(__file__).resolve().parents[2]


class Project(unittest.TestCase):
    def test_includes_go_down(self):
        self.assertEqual(check_tree(ROOT), [])

    def test_generated_files_go_down(self):
        with tempfile.TemporaryDirectory() as out:
            catalogue = sorted((ROOT / "schema/catalogue").glob("*.toml"))
            generate = [sys.executable, "-B", ROOT / "schema/generator/generate.py", "--out", out, *catalogue]
            subprocess.run(generate, check=True)
            self.assertGreater(len(list(Path(out).rglob("*.h"))), 286)
            self.assertEqual(check_tree(out), [])

    def test_every_layer_of_the_library_has_files(self):
        for name in ("rox", "kelbaselib", "model", "dict", "json", "convert", "lazy", "tools"):
            self.assertTrue(list((ROOT / LAYERS[name].folder).glob("*.h")), name)

    def test_table_goes_down(self):
        above = set(LAYERS)
        for name, layer in LAYERS.items():
            self.assertFalse(above.intersection(layer.below), f"{name} includes a layer that stands behind it")
            above.discard(name)

    def test_folders_and_prefixes_are_unique(self):
        for part in ("folder", "prefix"):
            values = [getattr(layer, part) for name, layer in LAYERS.items() if not name.startswith("tests/")]
            self.assertEqual(len(values), len(set(values)), part)

    def test_knot_is_there(self):
        self.assertIn("class LazyDict;", (ROOT / KNOT).read_text(encoding="utf-8"))


class Checker(unittest.TestCase):
    """Each case: a file, its text, and what the one complaint says; None for no complaint."""

    CASES = [
        (f"{SORN}/dict/A.h", '#include "sorn/model/B.h"', None),
        (f"{SORN}/dict/A.h", '#include "sorn/dict/B.h"', None),
        (f"{SORN}/dict/A.h", "#include <vector>\n#include <sys/time.h>", None),
        (f"{SORN}/dict/A.h", '#include "sorn/json/B.h"', "A.h:1: dict must not include sorn/json/B.h of json"),
        (f"{SORN}/dict/A.h", '#include "sorn/lazy/LazyDict.h"', "of lazy"),
        (f"{SORN}/dict/A.h", "// one\n\n#include <sorn/lazy/B.h>", "A.h:3: dict must not include"),
        (f"{SORN}/dict/A.cpp", '  #  include  "sorn/convert/B.h"', "A.cpp:1: dict must not include"),
        (f"{SORN}/dict/A.cpp", '#include "sornschema/Error.h"', "of sornschema"),
        (f"{SORN}/json/A.cpp", '#include "sorn/convert/B.h"', "json must not include"),
        (f"{SORN}/convert/A.cpp", '#include "sorn/json/B.h"', "convert must not include"),
        (f"{SORN}/lazy/A.cpp", '#include "sorn/json/B.h"\n#include "sornschema/Error.h"', None),
        (f"{SORN}/model/A.h", '#include "sorn/dict/B.h"', "model must not include"),
        (f"{SORN}/model/A.h", '#include "sorn/sorn.h"', "of sorn"),
        ("platform/rox/A.h", '#include "kelbaselib/B.h"', "rox must not include"),
        ("platform/rox/A.h", '#include "rox/B.h"', None),
        ("platform/kelbaselib/A.h", '#include "sorn/model/B.h"', "kelbaselib must not include"),
        ("sornschema/A.h", '#include "sorn/dict/B.h"', "sornschema must not include"),
        ("tools/A.cpp", '#include "sorn/lazy/B.h"\n#include "tools/C.h"', None),
        (f"{SORN}/lazy/A.cpp", '#include "tools/C.h"', "lazy must not include"),
        (f"{SORN}/dict/A.cpp", '#include "support/C.h"', "dict must not include"),
        ("tests/rox/A.cpp", '#include "rox/B.h"\n#include "Fixture.h"', None),
        ("tests/rox/A.cpp", '#include "sorn/model/B.h"', "tests/rox must not include"),
        ("tests/dict/A.cpp", '#include "sorn/lazy/B.h"\n#include "dict/Fixture.h"\n#include "support/C.h"', None),
        ("tests/lazy/A.cpp", '#include "convert/Fixture.h"', None),
        ("tests/convert/A.cpp", '#include "lazy/Fixture.h"', "tests/convert must not include"),
        ("tests/dict/A.cpp", '#include "tools/B.h"', "tests/dict must not include"),
        (f"{SORN}/dict/A.cpp", '#include "sorn/dict/B.cpp"', "includes the source file"),
        (f"{SORN}/dict/A.cpp", '#include "sorn/nowhere/B.h"', "sorn/nowhere/B.h lies in no layer"),
        (f"{SORN}/dict/A.cpp", '#include <rox/deep/B.h>', "lies in no layer"),
        (f"{SORN}/dict/A.cpp", '#include "../model/B.h"', "lies in no layer"),
        (f"{SORN}/nowhere/A.cpp", "", "A.cpp: lies in no layer"),
        ("A.h", "", "A.h: lies in no layer"),
        (f"{SORN}/json/A.h", "class LazyDict;", "only core/common/lib/sorn/dict/LazyBody.h declares LazyDict"),
        (f"{SORN}/dict/LazyBody.h", "class LazyDict;", None),
        (f"{SORN}/lazy/A.h", "class LazyDict;", None),
        ("build/rox/A.h", '#include "sorn/dict/B.h"', None),
        (".cache/A.h", "", None),
    ]

    def test_sees_what_is_wrong_and_only_that(self):
        for file, text, complaint in self.CASES:
            with self.subTest(file=file, text=text), tempfile.TemporaryDirectory() as root:
                path = Path(root) / file
                path.parent.mkdir(parents=True, exist_ok=True)
                path.write_text(text, encoding="utf-8")
                found = check_tree(root)
                self.assertEqual(len(found), 0 if complaint is None else 1, found)
                self.assertIn(complaint or "", "".join(found))


if __name__ == "__main__":
    unittest.main()
