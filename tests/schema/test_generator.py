"""The generator's checks, each with file, line and words; the layout rules; writing only what changed."""

import io
import os
import re
import subprocess
import sys
import tempfile
import unittest
from contextlib import redirect_stderr, redirect_stdout

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
GENERATOR = os.path.join(ROOT, "schema", "generator")
CATALOGUE = os.path.join(ROOT, "schema", "catalogue")
sys.dont_write_bytecode = True
sys.path.insert(0, GENERATOR)

import catalogue as model
import emit_tables
import generate
import layout

SETTINGS = "[schema]\nfirstVersion = 7\nlastVersion = 42\ndefaultVersion = 42\nnameTableSize = 11\n"
# Lines 1 to 5 are SETTINGS; what a test adds begins in line 6.
ENUM = "[enum.colour]\nid = 20\ncount = 3\nvalues = '''\n1 red\n2 blue\n'''\n"


def struct(name, identity, *fields, slots=9, extra=""):
    lines = [f"[struct.{name}]", f"id = {identity}", f"slots = {slots}"] + ([extra] if extra else [])
    return "\n".join([*lines, "fields = '''", *fields, "'''"]) + "\n"


class WithFolder(unittest.TestCase):
    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)

    def write(self, text, name="test.toml"):
        path = os.path.join(self.folder.name, name)
        with open(path, "w", encoding="utf-8") as f:
            f.write(text)
        return path

    def problems(self, *paths):
        """The messages, each without the folder's name."""
        try:
            generate.load(paths)
        except model.CatalogueError as error:
            return [p.replace(self.folder.name + os.sep, "") for p in error.problems]
        return []


HOW_A_FIELD_READS = ("a field reads: slot, name, type, reference where the type has one, "
                     "optional|required|multi, versions (first-last) where limited")

# A field line that is wrong, in line 10 of the file, and what is said of it.
FIELD_MESSAGES = (
    ("1 a", HOW_A_FIELD_READS),
    ("x a s32 optional", HOW_A_FIELD_READS),
    ("1 a enum colour optional 7-42 7-42", HOW_A_FIELD_READS),
    ("older", HOW_A_FIELD_READS),
    ("1 a s33 optional", 'unknown type "s33" of field "a"'),
    ("1 a s32 some", '"some" of field "a" is none of optional, required, multi'),
    ("1 a s32 optional 7-42 older", 'the older form of 1 "a" must stand below its current form'),
    ("0 a s32 optional", 'slot 0 of "a" is not from 1 to 8'),
    ("9 a s32 optional", 'slot 9 of "a" is not from 1 to 8'),
    ("1 Alpha s32 optional", 'the name "Alpha" is not lower camel case'),
    ("1 al_pha s32 optional", 'the name "al_pha" is not lower camel case'),
    *((f"1 {name} s32 optional", f'the field name "{name}" is a member of every record')
      for name in ("structId", "pMempoolM", "countM", "classTagG", "structIdG", "structInfoG", "vFieldInfoG",
                   "vFieldInfoHistoryG", "pFieldNamesG")),
    *((f"1 {name} s32 optional", f'the field name "{name}" has a meaning in generated code')
      for name in ("ref", "assert", "errno", "linux", "offsetof", "stderr", "stdin", "stdout", "unix")),
    ("1 a s32 colour optional", 'the type "s32" takes no reference, but has "colour"'),
    ("1 a enum optional", 'the type "enum" needs the name of its enum'),
    ("1 a object optional", 'the type "object" needs the name of its struct'),
    ("1 a enum shade optional", 'there is no enum "shade"'),
    ("1 a intid thing optional", 'there is no struct "thing"'),
    ("1 a enum one optional", '"enum" needs an enum, but "one" is a struct'),
    ("1 a object colour optional", '"object" needs a struct, but "colour" is an enum'),
    ("1 a stringid colour optional", '"stringid" needs a struct, but "colour" is an enum'),
    ("1 a s32 optional 9-8", 'the versions 9-8 of "a" are out of order'),
    ("1 a s32 optional 6-42", 'the versions 6-42 of "a" leave the bounds 7-42'),
    ("1 a s32 optional 7-43", 'the versions 7-43 of "a" leave the bounds 7-42'),
)

# Two lines of which the second, line 11, is wrong.
SECOND_FIELD_MESSAGES = (
    ("1 a s32 optional", "1 b s32 optional", "slot 1 is taken twice"),
    ("2 a s32 optional", "1 b s32 optional", "slot 1 stands behind slot 2"),
    ("1 a s32 optional", "2 a s32 optional", 'the field name "a" is taken at test.toml:10'),
    ("1 a s32 optional 8-42", "1 b s32 optional 7-7 older", 'the older form of 1 "b" must stand below its current form'),
    ("1 a s32 optional 8-42", "2 a s32 optional 7-7 older", 'the older form of 2 "a" must stand below its current form'),
    ("1 a s32 optional 8-42", "1 a s64 optional 7-8 older", 'the versions 7-8 of "a" overlap 8-42'),
    ("1 a s32 optional", "1 a s64 optional 7-8 older", 'the versions 7-8 of "a" overlap 7-42'),
    ("1 a s32 optional 8-42", "1 a s64 optional older", 'the versions 7-42 of "a" overlap 8-42'),
    ("1 a s32 optional 8-42", "1 a enum shade optional 7-7 older", 'there is no enum "shade"'),
)

# What replaces ENUM, the line counted from its first, and what is said.
ENUM_MESSAGES = (
    ("values = '''\n1 red\n3 blue\n'''", 6, 'value 3 of "colour" is not below its count 3'),
    ("values = '''\n2 red\n2 blue\n'''", 6, "value 2 is taken at test.toml:10"),
    ("values = '''\n2 red\n1 blue\n'''", 6, "value 1 stands behind value 2"),
    ("values = '''\n1 red\n2 red\n'''", 6, 'the value name "red" is taken at test.toml:10'),
    ("values = '''\n1 a-b\n2 a_b\n'''", 6, '"a_b" and "a-b" give the same C++ name'),
    ("values = '''\n1 red\n2 re\"d\n'''", 6, 'the value name "re"d" may have letters, digits, "_", "." and "-" only'),
    ("values = '''\n1 red\nx blue\n'''", 6, "a value reads: number, name"),
    ("values = '''\n1 red\n2 light blue\n'''", 6, "a value reads: number, name"),
    ("values = '''\n1 red\n'''", 1, 'the count 3 of "colour" is not its highest value 1 + 1'),
    ("values = '1 red'", 4, "\"values\" of [enum.colour] must be written between ''' and '''"),
    ("open = true\nvalues = '''\n1 red\n'''", 1, '"colour" is open and lists values all the same'),
    ("", 1, '"colour" has no values and is not open'),
    ("open = 1", 4, '"open" of [enum.colour] must be true or false'),
    ("shade = 1", 4, 'unknown key "shade" in [enum.colour]'),
)


class MessageTest(WithFolder):
    def test_field_lines(self):
        for line, words in FIELD_MESSAGES:
            with self.subTest(line):
                path = self.write(SETTINGS + struct("one", 1, line) + ENUM)
                self.assertEqual(self.problems(path), [f"test.toml:10: {words}"])

    def test_second_field_lines(self):
        for first, second, words in SECOND_FIELD_MESSAGES:
            with self.subTest(second):
                path = self.write(SETTINGS + struct("one", 1, first, second) + ENUM)
                self.assertEqual(self.problems(path), [f"test.toml:11: {words}"])

    def test_enumerations(self):
        for body, line, words in ENUM_MESSAGES:
            with self.subTest(body):
                path = self.write(f"{SETTINGS}[enum.colour]\nid = 20\ncount = 3\n{body}\n")
                self.assertEqual(self.problems(path), [f"test.toml:{5 + line}: {words}"])

    def test_count_of_an_enumeration(self):
        path = self.write(SETTINGS + "[enum.colour]\nid = 20\ncount = 0\nopen = true\n")
        self.assertEqual(self.problems(path), ['test.toml:6: the count 0 of "colour" is not from 1 to 1000000'])

    def test_structs(self):
        for text, line, words in (
            ("[struct.one]\nid = 0\nslots = 1\n", 6, 'id 0 of "one" is not from 1 to 65535'),
            ("[struct.one]\nid = 65536\nslots = 1\n", 6, 'id 65536 of "one" is not from 1 to 65535'),
            ("[struct.one]\nid = 1\nslots = 0\n", 6, '"one" needs at least one slot, number 0'),
            ("[struct.One]\nid = 1\nslots = 1\n", 6, 'the name "One" is not lower camel case'),
            ("[struct.one]\nslots = 1\n", 6, '[struct.one] has no "id"'),
            ("[struct.one]\nid = 1\n", 6, '[struct.one] has no "slots"'),
            ("[struct.one]\nid = '1'\nslots = 1\n", 7, '"id" of [struct.one] must be a number'),
            ("[struct.one]\nid = true\nslots = 1\n", 7, '"id" of [struct.one] must be a number'),
            ("[struct.one]\nid = 1\nslots = 1\nprefix = 3\n", 9, '"prefix" of [struct.one] must be a text'),
            ("[struct.one]\nid = 1\nslots = 1\nfields = 'x'\n", 9,
             "\"fields\" of [struct.one] must be written between ''' and '''"),
            ("[struct.one]\nid = 1\nslots = 1\nprefix = 'vuka'\n", 6,
             'the prefix "vuka" is not a word, a colon, two to four letters, a point'),
            ("[struct.one]\nid = 1\nslots = 1\nfoo = 3\n", 9, 'unknown key "foo" in [struct.one]'),
            ("[struct.one]\nid = 1\nslots = 1\n[struct.two]\nid = 1\nslots = 1\n", 9,
             'id 1 of "two" is taken by "one" at test.toml:6'),
            ("[struct.one]\nid = 1\nslots = 1\n" + ENUM.replace("20", "1"), 9,
             'id 1 of "colour" is taken by "one" at test.toml:6'),
            ("[struct.colour]\nid = 1\nslots = 1\n" + ENUM, 9, 'the name "colour" is taken at test.toml:6'),
            ("[struct.one]\nid = 1\nslots = 1\nprefix = 'vuka:on.'\n[struct.two]\nid = 2\nslots = 1\nprefix = 'vuka:on.'\n", 10,
             'the prefix "vuka:on." of "two" is that of "one" at test.toml:6'),
            ("[struct]\none = 1\n", 7, "[struct] holds only tables such as [struct.name]"),
            ("[record.one]\nid = 1\n", 1, 'unknown table or key "record"'),
            ("[record]\nid = 1\n", 6, 'unknown table or key "record"'),
        ):
            with self.subTest(text):
                self.assertEqual(self.problems(self.write(SETTINGS + text)), [f"test.toml:{line}: {words}"])

    def test_same_struct_in_two_files(self):
        first = self.write(SETTINGS + "[struct.one]\nid = 1\nslots = 1\n", "a.toml")
        second = self.write("# more\n[struct.one]\nid = 2\nslots = 1\n", "b.toml")
        self.assertEqual(self.problems(second, first), ['b.toml:2: the name "one" is taken at a.toml:6'])

    def test_class_names(self):
        # Lower camel case keeps two names from giving one class; only the first letter changes.
        path = self.write(SETTINGS + "[struct.one]\nid = 1\nslots = 1\n[struct.One]\nid = 2\nslots = 1\n")
        self.assertEqual(self.problems(path), ['test.toml:9: the name "One" is not lower camel case',
                                               'test.toml:9: "One" and "one" give the same class name'])

        path = self.write(SETTINGS + "[struct.Colour]\nid = 1\nslots = 1\n" + ENUM)
        self.assertEqual(self.problems(path), ['test.toml:6: the name "Colour" is not lower camel case',
                                               'test.toml:9: "colour" and "Colour" give the same class name'])
        for name in sorted(layout.RESERVED_CLASSES):
            lower = name[0].lower() + name[1:]
            for text in (f"[struct.{lower}]\nid = 1\nslots = 1\n", ENUM.replace("colour", lower)):
                self.assertEqual(self.problems(self.write(SETTINGS + text)), [
                    f'test.toml:6: the class name "{name}" of "{lower}" has a meaning in generated code'])

    def test_rows_per_id(self):
        rows = "[enum.types]\nid = 30\ncount = 31\nrowPerId = true\nvalues = '''\n1 one\n2 other\n'''\n"
        path = self.write(SETTINGS + "[struct.one]\nid = 1\nslots = 1\n" + rows)
        self.assertEqual(self.problems(path), ['test.toml:14: the row 1 is that of "one" and need not be listed'])
        path = self.write(SETTINGS + "[struct.one]\nid = 31\nslots = 1\n" + rows)
        self.assertEqual(self.problems(path), ['test.toml:6: id 31 of "one" is not below the count 31 of "types"'])

    def test_settings(self):
        for old, new, line, words in (
            ("lastVersion = 42", "lastVersion = 6", 3, "lastVersion must lie from firstVersion to 255"),
            ("lastVersion = 42", "lastVersion = 256", 3, "lastVersion must lie from firstVersion to 255"),
            ("defaultVersion = 42", "defaultVersion = 43", 4, "defaultVersion must lie from firstVersion to lastVersion"),
            ("defaultVersion = 42", "defaultVersion = 6", 4, "defaultVersion must lie from firstVersion to lastVersion"),
            ("nameTableSize = 11", "nameTableSize = 1", 5, "nameTableSize must be above the number of structs, 1"),
            ("nameTableSize = 11", "nameTableSize = 0", 5, '"nameTableSize" must be a number above 0'),
            ("nameTableSize = 11", "nameTableSize = '11'", 5, '"nameTableSize" must be a number above 0'),
            ("nameTableSize = 11", "nameTableSize = 11\ntables = 1", 6, 'unknown key "tables" in [schema]'),
        ):
            with self.subTest(new):
                path = self.write(SETTINGS.replace(old, new) + "[struct.one]\nid = 1\nslots = 1\n")
                self.assertIn(f"test.toml:{line}: {words}", self.problems(path))

    def test_settings_missing_and_twice(self):
        path = self.write("[schema]\nfirstVersion = 7\nlastVersion = 42\n")
        self.assertEqual(self.problems(path), ["catalogue:1: [schema] has no defaultVersion, nameTableSize"])
        again = self.write("[schema]\nlastVersion = 43\n", "z.toml")
        self.assertEqual(self.problems(self.write(SETTINGS), again), ['z.toml:2: "lastVersion" is set twice'])

    def test_toml_mistakes(self):
        for text, line in (("[struct.one\n", 6), ("[struct.one]\nid = \n", 7), ("[struct.one]\nid = 1\nid = 2\n", 8),
                           ("[struct.one]\nfields = '''\n1 a s32 optional\n", 9)):
            with self.subTest(text):
                problems = self.problems(self.write(SETTINGS + text))
                self.assertEqual(len(problems), 1)
                self.assertRegex(problems[0], rf"^test\.toml:{line}: [A-Z]")
                self.assertNotIn("column", problems[0])

    def test_unreadable_file(self):
        path = os.path.join(self.folder.name, "none.toml")
        self.assertRegex(self.problems(path)[0], r"^none\.toml:1: cannot be read: ")

    def test_offsets_out_of_range(self):
        # Presence bytes lie from 16 on: 496 fit 9 bits, the 497th does not.
        for count, expected in ((496, []), (497, ['test.toml:6: "one" has too many optional fields: '
                                                  'presence offsets have 9 bits'])):
            fields = [f"{i} f{i} bool optional" for i in range(1, count + 1)]
            path = self.write(SETTINGS + struct("one", 1, *fields, slots=count + 1))
            self.assertEqual(self.problems(path), expected)
        # 16 bytes of header and 16 a container: 4,095 fill 65,536 bytes.
        for count, expected in ((4095, []), (4096, ['test.toml:6: "one" is too large: storage offsets have 16 bits'])):
            fields = [f"{i} f{i} bool multi" for i in range(1, count + 1)]
            path = self.write(SETTINGS + struct("one", 1, *fields, slots=count + 1))
            self.assertEqual(self.problems(path), expected)
        fields = [f"{i} {'f' * 70}{i:04d} bool required" for i in range(1, 901)]
        path = self.write(SETTINGS + struct("one", 1, *fields, slots=901))
        self.assertEqual(self.problems(path), ['test.toml:6: the field names of "one" are too long: '
                                               'name offsets have 16 bits'])

    def test_every_mistake_is_told(self):
        path = self.write(SETTINGS + struct("one", 1, "1 a enum shade optional", "2 B s32 optional", "2 c s32 multi 1-2"))
        self.assertEqual(self.problems(path), [
            'test.toml:10: there is no enum "shade"', 'test.toml:11: the name "B" is not lower camel case',
            "test.toml:12: slot 2 is taken twice", 'test.toml:12: the versions 1-2 of "c" leave the bounds 7-42'])

    def test_command_line(self):
        good = self.write(SETTINGS + ENUM, "good.toml")
        bad = self.write(SETTINGS + struct("one", 1, "1 a s33 optional"), "bad.toml")
        words = io.StringIO()
        with redirect_stderr(words):
            self.assertEqual(generate.main(["--out", self.folder.name, bad]), 1)
        self.assertEqual(words.getvalue(), f'{bad}:10: unknown type "s33" of field "a"\n')
        self.assertFalse(os.path.exists(os.path.join(self.folder.name, "sornschema")))
        self.assertEqual(generate.main(["--out", self.folder.name, good]), 0)
        with redirect_stderr(io.StringIO()), self.assertRaises(SystemExit) as wrong:
            generate.main([good])
        self.assertEqual(wrong.exception.code, 2)


class LayoutTest(WithFolder):
    def members(self, *fields):
        found = generate.load([self.write(SETTINGS + struct("one", 1, *fields) + ENUM)])
        placed = layout.Layout(found.structs[0])
        return placed, [(m.name, m.presence_offset, m.storage_offset) for m in placed.members]

    def test_order_and_alignment(self):
        placed, members = self.members("1 zeta bool optional", "2 beta datetime optional", "3 alpha bool required",
                                       "4 alphaB channel multi", "5 alphaa object one optional", "6 gamma float required")
        # Capitals stand before small letters. 16, 17 are presence bytes; alpha 18; alphaB to 20 (alignment 4), 16 bytes;
        # alphaa 36; beta 40 (alignment 8); gamma 48; zeta 56; size rounded up to 64.
        self.assertEqual(members, [("alpha", 0, 18), ("alphaB", 0, 20), ("alphaa", 0, 36), ("beta", 16, 40),
                                   ("gamma", 0, 48), ("zeta", 17, 56)])
        self.assertEqual(placed.size, 64)

    def test_older_form_stands_before_the_current_one(self):
        _, members = self.members("1 a s32 optional 20-42", "1 a s64 optional 7-9 older", "1 a string multi 10-19 older",
                                  "2 namespace bool optional")
        # Presence: 16 a_7_9, 17 a, 18 namespace. a_7_9 at 24 (alignment 8), a_10_19 at 32, a at 48, namespace at 52.
        self.assertEqual(members, [("a_7_9", 16, 24), ("a_10_19", 0, 32), ("a", 17, 48), ("namespace_", 18, 52)])

    def test_only_value_types_have_presence_bytes(self):
        words = ("bool", "channel", "currency", "date", "datetime", "enum colour", "float", "intid one", "longid one",
                 "stringid one", "s64", "s32", "string", "time", "u32", "u64")
        for word in words:
            self.assertEqual(self.members(f"1 a {word} optional")[1][0][1], 16, word)
        for word in ("bytes", "anydict", "knowndict", "lazy", "object one"):
            self.assertEqual(self.members(f"1 a {word} optional")[1][0][1], 0, word)
        for arity in ("required", "multi"):
            self.assertEqual(self.members(f"1 a bool {arity}")[1][0][1], 0, arity)

    def test_names_in_slot_order(self):
        placed, _ = self.members("1 zeta bool optional", "3 be s32 multi", "4 alpha bool required")
        self.assertEqual(placed.name_offsets, {1: 0, 3: 5, 4: 8})
        self.assertEqual(placed.blob_size, 14)


class NameTableTest(unittest.TestCase):
    def test_hash(self):
        # ad: 97 * 31 + 100; abc: (97 * 31 + 98) * 31 + 99.
        self.assertEqual(emit_tables.name_hash("ad"), 3107)
        self.assertEqual(emit_tables.name_hash("abc"), 96354)
        self.assertEqual(emit_tables.name_hash("recording" * 4), sum(
            b * 31 ** i for i, b in enumerate(reversed(b"recording" * 4))) % 2 ** 32)

    def test_taken_entries_and_wrap_around(self):
        def named(name):
            return model.Struct(name, 1, None, 1, [], "", model.Place("", 1))
        # In a table of 4: a (97) 1, c (99) 3, d (100) 0; none is in another's way.
        table = emit_tables.name_table([named(n) for n in ("d", "a", "c")], 4)
        self.assertEqual({i: s.name for i, s in table.items()}, {1: "a", 3: "c", 0: "d"})
        # In a table of 3: a (97), d (100) and g (103) all 1; the second goes to 2, the third wraps to 0.
        table = emit_tables.name_table([named(n) for n in ("g", "d", "a")], 3)
        self.assertEqual({i: s.name for i, s in table.items()}, {1: "a", 2: "d", 0: "g"})


class OutputTest(WithFolder):
    def generate(self, *arguments):
        words = io.StringIO()
        with redirect_stdout(words):
            self.assertEqual(generate.main(["--out", os.path.join(self.folder.name, "out"), *arguments]), 0)
        return words.getvalue()

    def test_list_is_what_is_written(self):
        path = self.write(SETTINGS + struct("one", 1, "1 a s32 optional") + ENUM, "family.toml")
        told = self.generate("--list-outputs", path).split()
        self.assertFalse(os.path.exists(os.path.join(self.folder.name, "out")))
        self.generate(path)
        folder = os.path.join(self.folder.name, "out", "sornschema")
        self.assertEqual(told, sorted(os.path.join(folder, f) for f in os.listdir(folder)))
        self.assertEqual(sorted(os.listdir(folder)), ["Enums.cpp", "One.h", "Schema.cpp", "all.h", "enums.h",
                                                      "family1.cpp", "generated.stamp"])

    def test_only_changed_files_are_written(self):
        text = SETTINGS + struct("one", 1, "1 a s32 optional") + struct("two", 2, "1 b s32 optional") + ENUM
        self.generate(self.write(text))
        folder = os.path.join(self.folder.name, "out", "sornschema")
        for name in os.listdir(folder):
            os.utime(os.path.join(folder, name), (1, 1))
        self.generate(self.write(text.replace("1 b s32", "1 b s64")))
        fresh = sorted(n for n in os.listdir(folder) if os.stat(os.path.join(folder, n)).st_mtime > 1)
        self.assertEqual(fresh, ["Two.h", "generated.stamp", "test1.cpp"])

    def test_every_file_is_stamped(self):
        self.generate(self.write(SETTINGS + struct("one", 1, "1 a s32 optional") + ENUM))
        folder = os.path.join(self.folder.name, "out", "sornschema")
        for name in set(os.listdir(folder)) - {"generated.stamp"}:
            with open(os.path.join(folder, name), encoding="utf-8") as f:
                self.assertTrue(re.match(r"// Written by schema/generator [0-9a-f]{12} from ", f.readline()), name)

    def test_namespace(self):
        self.generate("--namespace", "other", self.write(SETTINGS + struct("one", 1, "1 a s32 optional") + ENUM))
        with open(os.path.join(self.folder.name, "out", "other", "One.h"), encoding="utf-8") as f:
            self.assertIn("namespace other {", f.read())

    def test_enumerators_are_valid_names(self):
        self.generate(self.write(SETTINGS + "[enum.mode]\nid = 3\ncount = 4\nvalues = '''\n1 12a\n2 a-b\n3 new\n'''\n"))
        with open(os.path.join(self.folder.name, "out", "sornschema", "enums.h"), encoding="utf-8") as f:
            text = f.read()
        for line in ("enum Mode : uint32_t {", "    Mode_12a = 1,", "    Mode_a_b = 2,", "    Mode_new = 3,"):
            self.assertIn(line + "\n", text)

    def test_variables_of_enumerations_do_not_collide(self):
        values = "values = '''\n0 red\n'''\n"
        self.generate(self.write(SETTINGS + "".join(
            f"[enum.{name}]\nid = {identity}\ncount = 1\n{values}" for identity, name in enumerate(
                ("x", "vX", "xDef", "vXDef", "names", "none", "enum"), 1))))
        with open(os.path.join(self.folder.name, "out", "sornschema", "Enums.cpp"), encoding="utf-8") as f:
            names = re.findall(r"^constinit const .*?(\w+)(?:\[\d+\])? = ", f.read().split("namespace sorn")[0], re.M)
        self.assertEqual(len(names), 2 * 7)
        self.assertEqual(len(set(names)), 2 * 7)

    def test_real_catalogue_from_the_shell(self):
        files = sorted(os.path.join(CATALOGUE, f) for f in os.listdir(CATALOGUE))
        script = os.path.join(GENERATOR, "generate.py")
        told = subprocess.run([sys.executable, script, "--out", self.folder.name, "--list-outputs", *files],
                              check=True, capture_output=True, text=True).stdout.split()
        self.assertEqual(sum(n.endswith(".h") for n in told), 286 + 2)
        self.assertEqual(sum(n.endswith(".stamp") for n in told), 1)


if __name__ == "__main__":
    unittest.main()
