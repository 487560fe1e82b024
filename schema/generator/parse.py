"""Reads catalogue files. Everything read carries its file and line, which `tomllib` does not give by itself."""

import os
import re
import tomllib

import datatypes
from catalogue import SETTINGS, Catalogue, CatalogueError, Enum, Field, Form, Place, Struct, Value

_STRUCT_KEYS = {"id": int, "prefix": str, "slots": int, "fields": str}
_ENUM_KEYS = {"id": int, "count": int, "open": bool, "rowPerId": bool, "values": str}


def parse_files(paths):
    """The catalogue of all files together. Raises CatalogueError with every mistake of form."""
    problems = []
    catalogue = Catalogue()
    for path in sorted(paths, key=os.path.basename):
        _FileReader(path, catalogue, problems).read()
    if problems:
        raise CatalogueError(problems)
    return catalogue


class _Lines:
    """Where tables, keys and the lines of multi-line texts stand in a file."""

    def __init__(self, text):
        self.tables = {}  # "struct.ad" -> line
        self.keys = {}    # ("struct.ad", "id") -> line
        self.texts = {}   # ("struct.ad", "fields") -> line of the text's first line
        table, inside = "", False
        for number, line in enumerate(text.split("\n"), 1):
            if inside:
                inside = "'''" not in line
            elif header := re.match(r"\s*\[([^\[\]]+)\]", line):
                table = header[1].replace(" ", "")
                self.tables[table] = number
            elif key := re.match(r"\s*(\w+)\s*=\s*(.*)", line):
                self.keys[(table, key[1])] = number
                if key[2].startswith("'''"):
                    self.texts[(table, key[1])] = number + (key[2].rstrip() == "'''")
                    inside = "'''" not in key[2][3:]


class _FileReader:
    def __init__(self, path, catalogue, problems):
        self.path = path
        self.catalogue = catalogue
        self.problems = problems
        self.family = os.path.splitext(os.path.basename(path))[0]

    def read(self):
        try:
            with open(self.path, encoding="utf-8") as f:
                text = f.read()
            data = tomllib.loads(text)
        except tomllib.TOMLDecodeError as error:
            return self._bad_toml(str(error), text)
        except (OSError, UnicodeDecodeError) as error:
            return self.problems.append(f"{self.path}:1: cannot be read: {error}")
        self.lines = _Lines(text)
        readers = {"struct": self._struct, "enum": self._enum}
        for kind, content in data.items():
            if kind == "schema" and isinstance(content, dict):
                self._settings(content)
            elif kind in readers and isinstance(content, dict):
                for name, body in content.items():
                    if isinstance(body, dict):
                        readers[kind](name, body)
                    else:
                        self._problem(self._line(kind, name), f"[{kind}] holds only tables such as [{kind}.name]")
            else:
                line = self.lines.tables.get(kind) or self.lines.keys.get(("", kind), 1)
                self._problem(line, f'unknown table or key "{kind}"')

    def _bad_toml(self, message, text):
        where = re.search(r" \(at line (\d+), column \d+\)$", message)
        at_end = text.count("\n") + 1
        line = int(where[1]) if where else at_end
        self._problem(line, re.sub(r" \(at (line \d+, column \d+|end of document)\)$", "", message))

    def _problem(self, line, message):
        self.problems.append(f"{self.path}:{line}: {message}")

    def _line(self, table, key=None):
        return self.lines.keys.get((table, key)) or self.lines.tables.get(table, 1)

    def _settings(self, content):
        for key, value in content.items():
            line = self._line("schema", key)
            if key not in SETTINGS:
                self._problem(line, f'unknown key "{key}" in [schema]')
            elif type(value) is not int or value < 1:
                self._problem(line, f'"{key}" must be a number above 0')
            elif key in self.catalogue.settings:
                self._problem(line, f'"{key}" is set twice')
            else:
                self.catalogue.settings[key] = value
                self.catalogue.setting_places[key] = Place(self.path, line)

    def _body(self, table, body, keys, needed):
        """Whether a table has the keys it needs, no others, and values of the right kind."""
        before = len(self.problems)
        for key, value in body.items():
            if key not in keys:
                self._problem(self._line(table, key), f'unknown key "{key}" in [{table}]')
            elif type(value) is not keys[key]:
                kind = {int: "a number", str: "a text", bool: "true or false"}[keys[key]]
                self._problem(self._line(table, key), f'"{key}" of [{table}] must be {kind}')
        for key in needed:
            if key not in body:
                self._problem(self._line(table), f'[{table}] has no "{key}"')
        return len(self.problems) == before

    def _text_lines(self, table, key, body):
        first = self.lines.texts.get((table, key))
        if key in body and first is None:
            self._problem(self._line(table, key), f"\"{key}\" of [{table}] must be written between ''' and '''")
            return
        for i, line in enumerate(body.get(key, "").split("\n")):
            if line.strip():
                yield Place(self.path, first + i), line.split()

    def _struct(self, name, body):
        table = f"struct.{name}"
        if not self._body(table, body, _STRUCT_KEYS, ("id", "slots")):
            return
        struct = Struct(name, body["id"], body.get("prefix"), body["slots"], [], self.family,
                        Place(self.path, self._line(table)))
        for place, words in self._text_lines(table, "fields", body):
            form, is_older = self._form(place, words)
            if form is None:
                continue
            if not is_older:
                struct.fields.append(Field(form))
            elif struct.fields and (struct.fields[-1].slot, struct.fields[-1].name) == (form.slot, form.name):
                struct.fields[-1].older.append(form)
            else:
                self._problem(place.line, f'the older form of {form.slot} "{form.name}" '
                              "must stand below its current form")
        self.catalogue.structs.append(struct)

    def _form(self, place, words):
        """A line such as `14 image object image multi 7-42 older`: the form, and whether it is an older one."""
        rest = list(words)
        is_older = rest[-1] == "older"
        if is_older:
            rest.pop()
        versions = None
        if re.fullmatch(r"\d+-\d+", rest[-1] if rest else ""):
            versions = tuple(int(v) for v in rest.pop().split("-"))
        if len(rest) not in (4, 5) or not rest[0].isdecimal():
            self._problem(place.line, "a field reads: slot, name, type, reference where the type has one, "
                          "optional|required|multi, versions (first-last) where limited")
            return None, False
        slot, name, word, *ref, arity = rest
        if word not in datatypes.BY_WORD:
            self._problem(place.line, f'unknown type "{word}" of field "{name}"')
            return None, False
        if arity not in datatypes.ARITIES:
            self._problem(place.line, f'"{arity}" of field "{name}" is none of optional, required, multi')
            return None, False
        form = Form(int(slot), name, datatypes.BY_WORD[word], ref[0] if ref else None, arity, versions, place)
        return form, is_older

    def _enum(self, name, body):
        table = f"enum.{name}"
        if not self._body(table, body, _ENUM_KEYS, ("id", "count")):
            return
        enum = Enum(name, body["id"], body["count"], body.get("open", False), body.get("rowPerId", False), [],
                    Place(self.path, self._line(table)))
        for place, words in self._text_lines(table, "values", body):
            if len(words) == 2 and words[0].isdecimal():
                enum.values.append(Value(int(words[0]), words[1], place))
            else:
                self._problem(place.line, "a value reads: number, name")
        self.catalogue.enums.append(enum)
