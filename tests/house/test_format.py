"""Hand-written C++ files look the way clang-format leaves them, and script/format sees one that does not."""

import shutil
import subprocess
import tempfile
import unittest
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]


def run_format(root, *arguments):
    return subprocess.run([root / "script/format", *arguments], capture_output=True, text=True)


class Project(unittest.TestCase):
    def test_files_are_formatted(self):
        done = run_format(ROOT, "--check")
        self.assertEqual(done.returncode, 0, done.stdout + done.stderr)


class Script(unittest.TestCase):
    BAD = "int   f( ) {return 1;}\n"
    GOOD = "int f() {\n    return 1;\n}\n"

    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.root = Path(folder.name)
        (self.root / "script").mkdir()
        shutil.copy(ROOT / "script/format", self.root / "script/format")
        shutil.copy(ROOT / ".clang-format", self.root / ".clang-format")
        self.file = self.root / "core/A.cpp"
        self.file.parent.mkdir()

    def test_check_passes_what_is_right(self):
        self.file.write_text(self.GOOD)
        self.assertEqual(run_format(self.root, "--check").returncode, 0)

    def test_check_reports_and_leaves_what_is_wrong(self):
        self.file.write_text(self.BAD)
        done = run_format(self.root, "--check")
        self.assertNotEqual(done.returncode, 0)
        self.assertIn("core/A.cpp", done.stdout + done.stderr)
        self.assertEqual(self.file.read_text(), self.BAD)

    def test_without_check_it_formats(self):
        self.file.write_text(self.BAD)
        self.assertEqual(run_format(self.root).returncode, 0)
        self.assertEqual(self.file.read_text(), self.GOOD)

    def test_paths_narrow_it_down(self):
        self.file.write_text(self.BAD)
        other = self.file.with_name("B.cpp")
        other.write_text(self.BAD)
        self.assertEqual(run_format(self.root, "core/B.cpp").returncode, 0)
        self.assertEqual((self.file.read_text(), other.read_text()), (self.BAD, self.GOOD))

    def test_build_folder_is_left_alone(self):
        self.file.write_text(self.GOOD)
        generated = self.root / "build/A.cpp"
        generated.parent.mkdir()
        generated.write_text(self.BAD)
        self.assertEqual(run_format(self.root, "--check").returncode, 0)

    def test_unknown_option_is_wrong_usage(self):
        self.assertEqual(run_format(self.root, "--chek").returncode, 2)


if __name__ == "__main__":
    unittest.main()
