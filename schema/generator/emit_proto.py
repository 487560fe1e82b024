"""The schema in the language of Protocol Buffers (proto2): the same bytes as the library's binary form, for tests and
benchmarks against an independent peer. A known dict is a message with one optional field per struct id; in a oneof, on
demand, so that the peer keeps one pointer for it and not hundreds. The bytes are the same."""

from catalogue import CatalogueError

_SCALARS = {
    "BOOL": "bool",
    "BYTESTRING": "bytes",
    "CHANNEL": "string",
    "CURRENCY": "string",
    "DATE": "sint32",
    "DATETIME": "sint64",
    "ENUM": "uint32",
    "FLOAT": "double",
    "INT_ID": "uint32",
    "LONG_ID": "uint64",
    "STRING_ID": "string",
    "S64": "sint64",
    "S32": "sint32",
    "STRING": "string",
    "TIME": "uint32",
    "U32": "uint32",
    "U64": "uint64",
}
_MESSAGES = {"ANY_DICT": "AnyDictBody", "KNOWN_DICT": "KnownDict", "KNOWN_DICT_AS_LAZY": "KnownDict"}

_HEAD = """syntax = "proto2";

package {package};

option optimize_for = SPEED;
option cc_enable_arenas = true;

message AnyDictBody {{
  repeated AnyDictEntry entry = 4;
}}

message AnyDictEntry {{
  optional string name = 6;
  repeated AnyDictValue value = 8;
}}

message AnyDictValue {{
  optional string text = 2;
  repeated AnyDictEntry entry = 4;
}}
"""

# Numbers that Protocol Buffers keeps for itself.
_RESERVED = range(19000, 20000)


def emit(catalogue, package, is_oneof):
    """The text of the file, without its first line. Required fields are optional ones here: readers take either."""
    _check(catalogue)
    class_names = {s.name: s.class_name for s in catalogue.structs}
    lines = [_HEAD.format(package=package), "message KnownDict {"]
    if is_oneof:
        lines += ["  oneof record {", *(f"    {s.class_name} {s.name} = {s.id};" for s in catalogue.structs), "  }"]
    else:
        lines += [f"  optional {s.class_name} {s.name} = {s.id};" for s in catalogue.structs]
    lines += ["}"]
    for s in catalogue.structs:
        lines += ["", f"message {s.class_name} {{", *(_field(f.current, class_names) for f in s.fields), "}"]
    return "\n".join(lines) + "\n"


def _field(form, class_names):
    constant = form.type.constant
    type_name = _SCALARS.get(constant) or _MESSAGES.get(constant) or class_names[form.ref]
    label = "repeated" if form.arity == "multi" else "optional"
    may_be_packed = constant in _SCALARS and type_name not in ("bytes", "string")
    not_packed = " [packed = false]" if label == "repeated" and may_be_packed else ""
    return f"  {label} {type_name} {form.name} = {form.slot}{not_packed};"


def _check(catalogue):
    problems = []
    for s in catalogue.structs:
        if s.id in _RESERVED:
            problems.append(f"{s.place}: the id {s.id} is one that Protocol Buffers reserves")
        if s.class_name in ("AnyDictBody", "AnyDictEntry", "AnyDictValue", "KnownDict"):
            problems.append(f'{s.place}: the name "{s.name}" is taken in the proto2 file')
    if problems:
        raise CatalogueError(problems)
