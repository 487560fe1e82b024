"""The catalogue in memory: records, their fields, enumerations, and where each stands in its file."""

from dataclasses import dataclass, field
from typing import NamedTuple, Optional

import datatypes

SETTINGS = ("firstVersion", "lastVersion", "defaultVersion", "nameTableSize")  # of [schema], all needed


class Place(NamedTuple):
    """Where something stands, for messages."""
    file: str
    line: int

    def __str__(self):
        return f"{self.file}:{self.line}"


class CatalogueError(Exception):
    """A mistake in the catalogue: one `file:line: message` per mistake."""

    def __init__(self, problems):
        super().__init__("\n".join(problems))
        self.problems = problems


@dataclass
class Form:
    """One form of a field: the current one or an older variant. Without a version range the schema's bounds hold."""
    slot: int
    name: str
    type: datatypes.DataType
    ref: Optional[str]
    arity: str
    versions: Optional[tuple]
    place: Place
    first: int = 0  # filled from `versions` or the schema's bounds
    last: int = 0

    @property
    def has_presence_byte(self):
        return self.arity == "optional" and not self.type.is_reference


@dataclass
class Field:
    current: Form
    older: list = field(default_factory=list)

    @property
    def slot(self):
        return self.current.slot

    @property
    def name(self):
        return self.current.name


@dataclass
class Struct:
    name: str
    id: int
    prefix: Optional[str]
    slots: int
    fields: list  # of Field, in slot order
    family: str   # the name of its file
    place: Place

    @property
    def class_name(self):
        return upper_first(self.name)


@dataclass
class Value:
    number: int
    name: str
    place: Place


@dataclass
class Enum:
    name: str
    id: int
    count: int
    is_open: bool
    row_per_id: bool
    values: list  # of Value
    place: Place

    @property
    def class_name(self):
        return upper_first(self.name)


@dataclass
class Catalogue:
    settings: dict = field(default_factory=dict)        # of [schema]
    setting_places: dict = field(default_factory=dict)
    structs: list = field(default_factory=list)
    enums: list = field(default_factory=list)

    def finish(self):
        """After the checks: name order for all, version ranges, and the rows that name the types themselves."""
        self.structs.sort(key=lambda s: s.name)
        self.enums.sort(key=lambda e: e.name)
        bounds = (self.settings["firstVersion"], self.settings["lastVersion"])
        for struct in self.structs:
            for f in struct.fields:
                for form in [f.current, *f.older]:
                    form.first, form.last = form.versions or bounds
        for enum in self.enums:
            if enum.row_per_id:
                enum.values += [Value(t.id, t.name, t.place) for t in self.structs + self.enums]
                enum.values.sort(key=lambda v: v.number)

    def type_id(self, form):
        """The `typeRef` of a form."""
        if form.ref is None:
            return 0
        return (self._enums_by_name() if form.type.refers == "enum" else self._structs_by_name())[form.ref].id

    def _structs_by_name(self):
        if not hasattr(self, "_structs"):
            self._structs = {s.name: s for s in self.structs}
        return self._structs

    def _enums_by_name(self):
        if not hasattr(self, "_enums"):
            self._enums = {e.name: e for e in self.enums}
        return self._enums


def upper_first(name):
    return name[0].upper() + name[1:]
