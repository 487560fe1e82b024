"""The proto2 file of a catalogue."""

import contextlib
import io
import os
import sys
import tempfile
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.dont_write_bytecode = True
sys.path.insert(0, os.path.join(ROOT, "schema", "generator"))

import generate

HEAD = "[schema]\nfirstVersion = 7\nlastVersion = 42\ndefaultVersion = 42\nnameTableSize = 11\n"
COLOUR = "[enum.colour]\nid = 20\ncount = 2\nvalues = '''\n1 red\n'''\n"

# A field of the catalogue and its line in the proto2 file. Only packable repeated fields say that they are not packed.
FIELDS = (
    ("1 a bool required", "optional bool a = 1;"),
    ("1 a bytes optional", "optional bytes a = 1;"),
    ("1 a channel optional", "optional string a = 1;"),
    ("1 a currency optional", "optional string a = 1;"),
    ("1 a date optional", "optional sint32 a = 1;"),
    ("1 a datetime optional", "optional sint64 a = 1;"),
    ("1 a anydict optional", "optional AnyDictBody a = 1;"),
    ("1 a enum colour optional", "optional uint32 a = 1;"),
    ("1 a float optional", "optional double a = 1;"),
    ("1 a intid optional", "optional uint32 a = 1;"),
    ("1 a longid optional", "optional uint64 a = 1;"),
    ("1 a stringid optional", "optional string a = 1;"),
    ("1 a knowndict optional", "optional KnownDict a = 1;"),
    ("1 a lazy required", "optional KnownDict a = 1;"),
    ("1 a object oneThing optional", "optional OneThing a = 1;"),
    ("1 a s64 optional", "optional sint64 a = 1;"),
    ("1 a s32 optional", "optional sint32 a = 1;"),
    ("1 a string optional", "optional string a = 1;"),
    ("1 a time optional", "optional uint32 a = 1;"),
    ("1 a u32 optional", "optional uint32 a = 1;"),
    ("8 a u64 optional", "optional uint64 a = 8;"),
    ("1 a bool multi", "repeated bool a = 1 [packed = false];"),
    ("1 a date multi", "repeated sint32 a = 1 [packed = false];"),
    ("1 a float multi", "repeated double a = 1 [packed = false];"),
    ("1 a string multi", "repeated string a = 1;"),
    ("1 a bytes multi", "repeated bytes a = 1;"),
    ("1 a object oneThing multi", "repeated OneThing a = 1;"),
    ("1 a s64 optional 20-42\n1 a s32 required 7-19 older", "optional sint64 a = 1;"),
)


class ProtoTest(unittest.TestCase):
    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)

    def generate(self, name, identity, fields, *options):
        """The exit code, the file's text (None without a file) and what was complained of."""
        catalogue = os.path.join(self.folder.name, "a.toml")
        with open(catalogue, "w", encoding="utf-8") as f:
            f.write(f"{HEAD}[struct.{name}]\nid = {identity}\nslots = 9\nfields = '''\n{fields}\n'''\n{COLOUR}")
        path = os.path.join(self.folder.name, "a.proto")
        words = io.StringIO()
        with contextlib.redirect_stderr(words):
            code = generate.main(["--proto", path, *options, catalogue])
        if not os.path.exists(path):
            return code, None, words.getvalue()
        with open(path, encoding="utf-8") as f:
            return code, f.read(), words.getvalue()

    def test_fields(self):
        for field, line in FIELDS:
            with self.subTest(field=field):
                code, text, _ = self.generate("oneThing", 3, field)
                self.assertEqual(code, 0)
                self.assertTrue(text.endswith(f"\nmessage OneThing {{\n  {line}\n}}\n"), text[-200:])

    def test_known_dicts(self):
        _, text, _ = self.generate("oneThing", 3, "1 a bool required")
        self.assertIn("\nmessage KnownDict {\n  optional OneThing oneThing = 3;\n}\n", text)
        _, text, _ = self.generate("oneThing", 3, "1 a bool required", "--oneof")
        self.assertIn("\nmessage KnownDict {\n  oneof record {\n    OneThing oneThing = 3;\n  }\n}\n", text)

    def test_nothing_else_is_written(self):
        _, text, _ = self.generate("oneThing", 3, "1 a bool required")
        self.assertIn('\nsyntax = "proto2";\n\npackage a;\n', text)
        self.assertIn("\nmessage AnyDictEntry {\n  optional string name = 6;\n  repeated AnyDictValue value = 8;\n}\n", text)
        self.assertEqual(sorted(os.listdir(self.folder.name)), ["a.proto", "a.toml"])

    def test_what_protocol_buffers_cannot_take(self):
        for name, identity, words in (
            ("oneThing", 18999, None),
            ("oneThing", 19000, "the id 19000 is one that Protocol Buffers reserves"),
            ("oneThing", 19999, "the id 19999 is one that Protocol Buffers reserves"),
            ("oneThing", 20000, None),
            ("knownDict", 3, 'the name "knownDict" is taken in the proto2 file'),
            ("anyDictEntry", 3, 'the name "anyDictEntry" is taken in the proto2 file'),
        ):
            with self.subTest(name=name, identity=identity):
                code, text, told = self.generate(name, identity, "1 a bool required")
                self.assertEqual(code, 0 if words is None else 1)
                self.assertEqual(told.split(": ")[-1].strip(), words or "")
                if text is not None:
                    os.remove(os.path.join(self.folder.name, "a.proto"))


if __name__ == "__main__":
    unittest.main()
