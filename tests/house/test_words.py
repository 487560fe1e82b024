"""Words that the project does not carry: references to papers that do not come with it, and reminders left in code. The
words are written in pieces here, so that this file has none of them."""

import re
import tempfile
import unittest
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]
NOT_OURS = {"build", ".git", "__pycache__"}

ANYWHERE = re.compile(
    "|".join(
        (
            r"\bPa" + r"rt [1-8]\.[0-9]\b",
            r"\bthe sp" + r"ec\b",
            r"\bspecifi" + r"cation\b",
            r"\bas speci" + r"fied\b",
            r"\bsp" + r"ec\.md\b",
            r"\biss" + r"ue #?[0-9]+\b",
        )
    ),
    re.IGNORECASE,
)
IN_CODE = re.compile(r"\b(TO" + r"DO|FIX" + r"ME|XX" + r"X|HA" + r"CK)\b|not imple" + r"mented")
# Texts that the id forms and their tests really have: three capital letters as a whole text stand for an id without struct.
ID_WITHOUT_STRUCT = re.compile('"XX' + 'X"')
# What switches a test or a check off needs a reason beside it: words that it prints, or a comment there or in the line
# before.
SWITCHED_OFF = re.compile(
    "|".join(("GTEST_" + "SKIP", "DISABLED" + "_", "--gtest_" + "filter=-", r"\|\| " + "true", "continue-on-" + "error"))
)
COMMENT = re.compile(r"(^|\s)(//|#)\s*\w")
PRINTED = re.compile(r'<< "\w')


def check_text(file, text):
    """Complaints about one file."""
    complaints = []
    before = ""
    for number, line in enumerate(text.split("\n"), 1):
        kinds = [("word", ANYWHERE, line)]
        if not file.endswith(".md"):
            kinds.append(("reminder", IN_CODE, ID_WITHOUT_STRUCT.sub("", line)))
        if not any((COMMENT.search(before), COMMENT.search(line), PRINTED.search(line))):
            kinds.append(("switched off without a reason", SWITCHED_OFF, line))
        before = line
        for kind, pattern, searched in kinds:
            match = pattern.search(searched)
            if match:
                complaints.append(f"{file}:{number}: {kind}: {match.group()}")
    return complaints


def check_tree(root):
    """Complaints about all text files under a folder, and about their names."""
    root = Path(root)
    complaints = []
    for path in sorted(root.rglob("*")):
        file = path.relative_to(root)
        if NOT_OURS.intersection(file.parts) or not path.is_file():
            continue
        data = path.read_bytes()
        if b"\0" in data:
            continue
        complaints += check_text(file.as_posix(), data.decode("utf-8", "replace"))
        if ANYWHERE.search(file.as_posix()):
            complaints.append(f"{file}: name")
    return complaints


class Project(unittest.TestCase):
    def test_no_file_has_them(self):
        self.assertEqual(check_tree(ROOT), [])


class Checker(unittest.TestCase):
    CASES = [
        ("a.cpp", "// by Pa" + "rt 3.4", True),
        ("a.md", "see pa" + "rt 3.4.", True),
        ("a.cpp", "// the second part 3 of 4", False),
        ("a.cpp", "// Pa" + "rt 9.1", False),
        ("a.cpp", "// The Sp" + "ec says", True),
        ("a.cpp", "// the special case", False),
        ("a.py", "# a Specifi" + "cation of", True),
        ("a.py", "# as speci" + "fied", True),
        ("a.py", "# iss" + "ue 12", True),
        ("a.py", "# iss" + "ue #7", True),
        ("a.py", "# issues a request", False),
        ("a.cpp", "// TO" + "DO: more", True),
        ("a.md", "a TO" + "DO list", False),
        ("a.cpp", "// todo", False),
        ("a.cpp", '"XX' + 'X"', False),
        ("a.cpp", "// XX" + "X", True),
        ("a.cpp", 'return "not imple' + 'mented";', True),
        ("a.cpp", "TEST(A, DISABLED" + "_B)", True),
        ("a.cpp", "GTEST_" + "SKIP();", True),
        ("a.cpp", "GTEST_" + 'SKIP() << "no such locale here";', False),
        ("run", "make || " + "true", True),
        ("run", "make || " + "true  # the old files may be gone", False),
        ("run", "# The old files may be gone.\nmake || " + "true", False),
        ("run", "# The old files may be gone.\n\nmake || " + "true", True),
        ("sp" + "ec.md", "", True),
        ("build/a.cpp", "// the sp" + "ec", False),
    ]

    def test_sees_what_is_wrong_and_only_that(self):
        for file, text, wrong in self.CASES:
            with self.subTest(file=file, text=text), tempfile.TemporaryDirectory() as root:
                path = Path(root) / file
                path.parent.mkdir(parents=True, exist_ok=True)
                path.write_text(text, encoding="utf-8")
                self.assertEqual(len(check_tree(root)), 1 if wrong else 0)


if __name__ == "__main__":
    unittest.main()
