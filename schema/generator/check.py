"""The rules that a catalogue must keep. Each mistake is told with the file and line where it stands."""

import re

import layout
from catalogue import SETTINGS, CatalogueError

MAX_ID = 65535          # typeRef has 16 bits
MAX_VERSION = 255       # version bytes
MAX_COUNT = 1_000_000   # an enumeration's names are a dense table

_LOWER_CAMEL = re.compile(r"[a-z][A-Za-z0-9]*")
_VALUE_NAME = re.compile(r"[A-Za-z0-9_.-]+")
_PREFIX = re.compile(r"[a-z]+:[a-z]{2,4}\.")


def check(catalogue):
    """Raises CatalogueError with every mistake found."""
    checker = _Checker(catalogue)
    checker.run()
    if checker.problems:
        raise CatalogueError(checker.problems)


class _Checker:
    def __init__(self, catalogue):
        self.catalogue = catalogue
        self.settings = catalogue.settings
        self.problems = []
        self.structs = {s.name for s in catalogue.structs}
        self.enums = {e.name for e in catalogue.enums}

    def problem(self, place, message):
        self.problems.append(f"{place}: {message}")

    def run(self):
        if not self.check_settings():
            return
        self.check_names_and_ids()
        for struct in self.catalogue.structs:
            self.check_struct(struct)
        for enum in self.catalogue.enums:
            self.check_enum(enum)

    def check_settings(self):
        missing = [k for k in SETTINGS if k not in self.settings]
        if missing:
            self.problems.append("catalogue:1: [schema] has no " + ", ".join(missing))
            return False
        first, last, default, entries = (self.settings[k] for k in SETTINGS)
        places, n_structs = self.catalogue.setting_places, len(self.catalogue.structs)
        if not first <= last <= MAX_VERSION:
            self.problem(places["lastVersion"], f"lastVersion must lie from firstVersion to {MAX_VERSION}")
        if not first <= default <= last:
            self.problem(places["defaultVersion"], "defaultVersion must lie from firstVersion to lastVersion")
        if entries <= n_structs:
            self.problem(places["nameTableSize"], f"nameTableSize must be above the number of structs, {n_structs}")
        return not self.problems

    def check_names_and_ids(self):
        owners, names, classes, prefixes = {}, {}, {}, {}
        for t in self.catalogue.structs + self.catalogue.enums:
            if not 1 <= t.id <= MAX_ID:
                self.problem(t.place, f'id {t.id} of "{t.name}" is not from 1 to {MAX_ID}')
            if not _LOWER_CAMEL.fullmatch(t.name):
                self.problem(t.place, f'the name "{t.name}" is not lower camel case')
            if other := owners.setdefault(t.id, t):
                if other is not t:
                    self.problem(t.place, f'id {t.id} of "{t.name}" is taken by "{other.name}" at {other.place}')
            if names.setdefault(t.name, t) is not t:
                self.problem(t.place, f'the name "{t.name}" is taken at {names[t.name].place}')
            elif classes.setdefault(t.class_name, t) is not t:
                self.problem(t.place, f'"{t.name}" and "{classes[t.class_name].name}" give the same class name')
            if t.class_name in layout.RESERVED_CLASSES:
                self.problem(t.place, f'the class name "{t.class_name}" of "{t.name}" has a meaning in generated code')
        for s in self.catalogue.structs:
            if s.prefix is not None and (other := prefixes.setdefault(s.prefix, s)) is not s:
                self.problem(s.place, f'the prefix "{s.prefix}" of "{s.name}" is that of "{other.name}" at {other.place}')

    def check_struct(self, struct):
        if struct.prefix is not None and not _PREFIX.fullmatch(struct.prefix):
            self.problem(struct.place, f'the prefix "{struct.prefix}" is not '
                         "a word, a colon, two to four letters, a point")
        if struct.slots < 1:
            self.problem(struct.place, f'"{struct.name}" needs at least one slot, number 0')
        seen, previous = {}, 0
        for f in struct.fields:
            form = f.current
            if not 1 <= form.slot < struct.slots:
                self.problem(form.place, f'slot {form.slot} of "{form.name}" is not from 1 to {struct.slots - 1}')
            elif form.slot == previous:
                self.problem(form.place, f'slot {form.slot} is taken twice')
            elif form.slot < previous:
                self.problem(form.place, f"slot {form.slot} stands behind slot {previous}")
            previous = max(previous, form.slot)
            if not _LOWER_CAMEL.fullmatch(form.name):
                self.problem(form.place, f'the name "{form.name}" is not lower camel case')
            if seen.setdefault(form.name, form) is not form:
                self.problem(form.place, f'the field name "{form.name}" is taken at {seen[form.name].place}')
            if form.name in layout.RESERVED:
                self.problem(form.place, f'the field name "{form.name}" is a member of every record')
            elif form.name in layout.TAKEN:
                self.problem(form.place, f'the field name "{form.name}" has a meaning in generated code')
            for one in (form, *f.older):
                self.check_reference(one)
            self.check_versions(f)
        self.check_numbers(struct)

    def check_reference(self, form):
        kind = form.type.refers
        if not kind:
            if form.ref is not None:
                self.problem(form.place, f'the type "{form.type.word}" takes no reference, but has "{form.ref}"')
            return
        if form.ref is None:
            if not form.type.refOptional:
                self.problem(form.place, f'the type "{form.type.word}" needs the name of its {kind}')
            return
        wanted, other = (self.enums, self.structs) if kind == "enum" else (self.structs, self.enums)
        if form.ref in wanted:
            return
        article = {"enum": "an enum", "struct": "a struct"}
        if form.ref in other:
            told = article["struct" if kind == "enum" else "enum"]
            self.problem(form.place, f'"{form.type.word}" needs {article[kind]}, but "{form.ref}" is {told}')
        else:
            self.problem(form.place, f'there is no {kind} "{form.ref}"')

    def check_versions(self, f):
        bounds = (self.settings["firstVersion"], self.settings["lastVersion"])
        ranges = []
        for form in (f.current, *f.older):
            first, last = form.versions or bounds
            told = f'the versions {first}-{last} of "{form.name}"'
            if first > last:
                self.problem(form.place, f"{told} are out of order")
            elif first < bounds[0] or last > bounds[1]:
                self.problem(form.place, f"{told} leave the bounds {bounds[0]}-{bounds[1]}")
            for other in ranges:
                if first <= other[1] and other[0] <= last:
                    self.problem(form.place, f"{told} overlap {other[0]}-{other[1]}")
            ranges.append((first, last))

    def check_numbers(self, struct):
        placed = layout.Layout(struct)
        if placed.last_presence_offset > layout.MAX_PRESENCE_OFFSET:
            self.problem(struct.place, f'"{struct.name}" has too many optional fields: presence offsets have 9 bits')
        if placed.size - 1 > layout.MAX_STORAGE_OFFSET:
            self.problem(struct.place, f'"{struct.name}" is too large: storage offsets have 16 bits')
        if placed.blob_size - 1 > layout.MAX_STORAGE_OFFSET:
            self.problem(struct.place, f'the field names of "{struct.name}" are too long: name offsets have 16 bits')

    def check_enum(self, enum):
        if not 1 <= enum.count <= MAX_COUNT:
            self.problem(enum.place, f'the count {enum.count} of "{enum.name}" is not from 1 to {MAX_COUNT}')
        if enum.is_open and (enum.values or enum.row_per_id):
            self.problem(enum.place, f'"{enum.name}" is open and lists values all the same')
        if not enum.is_open and not enum.values and not enum.row_per_id:
            self.problem(enum.place, f'"{enum.name}" has no values and is not open')
        numbers, names, identifiers, previous = {}, {}, {}, -1
        for v in enum.values:
            if v.number >= enum.count:
                self.problem(v.place, f'value {v.number} of "{enum.name}" is not below its count {enum.count}')
            if not _VALUE_NAME.fullmatch(v.name):
                self.problem(v.place, f'the value name "{v.name}" may have letters, digits, "_", "." and "-" only')
            if numbers.setdefault(v.number, v) is not v:
                self.problem(v.place, f'value {v.number} is taken at {numbers[v.number].place}')
            elif v.number < previous:
                self.problem(v.place, f"value {v.number} stands behind value {previous}")
            previous = max(previous, v.number)
            if names.setdefault(v.name, v) is not v:
                self.problem(v.place, f'the value name "{v.name}" is taken at {names[v.name].place}')
            elif identifiers.setdefault(layout.identifier(v.name), v) is not v:
                other = identifiers[layout.identifier(v.name)]
                self.problem(v.place, f'"{v.name}" and "{other.name}" give the same C++ name')
        if enum.row_per_id:
            self.check_rows(enum, numbers)
        elif enum.values and not enum.is_open and previous + 1 < enum.count:
            self.problem(enum.place, f'the count {enum.count} of "{enum.name}" is not its highest value {previous} + 1')

    def check_rows(self, enum, numbers):
        for t in self.catalogue.structs + self.catalogue.enums:
            if t.id >= enum.count:
                self.problem(t.place, f'id {t.id} of "{t.name}" is not below the count {enum.count} of "{enum.name}"')
            if t.id in numbers:
                self.problem(numbers[t.id].place, f'the row {t.id} is that of "{t.name}" and need not be listed')
