"""What is installed serves applications: by CMake, by pkg-config, every header alone, and the tool from its place. SORN_BUILD is
the folder that the package is installed from."""

import os
import subprocess
import tempfile
import unittest
from concurrent.futures import ThreadPoolExecutor
from pathlib import Path

HERE = Path(__file__).parent
BUILD = os.environ["SORN_BUILD"]
COMPILER = os.environ.get("CXX", "c++")
EXPECTED = '{"bodyId": "tsn:1", "title": "Tide Tables", "type": "recording"}\n'


def run(*command, **options):
    done = subprocess.run([str(each) for each in command], capture_output=True, text=True, timeout=600, **options)
    if done.returncode != 0:
        raise AssertionError(f"{' '.join(map(str, command))}\n{done.stdout}{done.stderr}")
    return done.stdout


class Package(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        folder = tempfile.TemporaryDirectory()
        cls.addClassCleanup(folder.cleanup)
        cls.folder = Path(folder.name)
        first = cls.folder / "first"
        run("cmake", "--install", BUILD, "--prefix", first)
        # It may be moved afterwards.
        cls.prefix = first.rename(cls.folder / "prefix")
        cls.libraries = next(cls.prefix.glob("lib*/**/libsorn.so")).parent
        cls.environment = {**os.environ, "SORN_BUS": str(cls.folder / "bus"), "PKG_CONFIG_PATH": str(cls.libraries / "pkgconfig")}

    def flags(self, *options):
        return run("pkg-config", *options, "sorn", env=self.environment).split()

    def test_application_by_cmake(self):
        build = self.folder / "by_cmake"
        run("cmake", "-S", HERE, "-B", build, f"-DCMAKE_PREFIX_PATH={self.prefix}", f"-DCMAKE_CXX_COMPILER={COMPILER}")
        run("cmake", "--build", build)
        self.assertEqual(run(build / "application", env=self.environment), EXPECTED)

    def test_application_by_pkg_config(self):
        program = self.folder / "by_pkg_config"
        run(COMPILER, "-std=c++20", HERE / "main.cpp", "-o", program, *self.flags("--cflags", "--libs"))
        self.assertEqual(run(program, env={**self.environment, "LD_LIBRARY_PATH": str(self.libraries)}), EXPECTED)

    def test_each_header_alone(self):
        flags = self.flags("--cflags")
        include = self.prefix / "include/sorn"
        headers = sorted(path.relative_to(include) for path in include.rglob("*.h"))
        self.assertGreater(len(headers), 300)
        # Of the generated ones, which are alike, a few.
        alone = [each for each in headers if each.parts[0] != "sornschema"] + [
            Path("sornschema", name) for name in ("all.h", "Recording.h", "OrvoRpcRequest.h")]

        def compile_alone(header):
            run(COMPILER, "-std=c++20", "-Wall", "-Wextra", "-Werror", "-fsyntax-only", "-x", "c++", "-", *flags,
                input=f'#include "{header}"\n')

        with ThreadPoolExecutor(2) as pool:
            list(pool.map(compile_alone, alone))

    def test_tool(self):
        tool = self.prefix / "bin/sorn"
        done = run(tool, "convert", input='{"type":"recording","bodyId":"tsn:1","title":"Tide Tables"}')
        self.assertEqual(done, EXPECTED)
        completion = self.prefix / "share/bash-completion/completions/sorn"
        self.assertIn("sorn", run("bash", "-c", f"source {completion}; complete -p sorn"))


if __name__ == "__main__":
    unittest.main()
