"""The enumerations' header and tables, and the roots of the schema."""

import layout

_NULLS_PER_LINE = 16


def emit_enum_header(enums, namespace):
    """`enums.h`: unscoped enums with prefixed names, which are valid identifiers whatever the value is called."""
    lines = ["#pragma once", "", "#include <cstdint>", "", f"namespace {namespace} {{", ""]
    for e in enums:
        lines.append(f"/// Enumeration `{e.name}`, id {e.id}, count {e.count}.")
        if e.is_open:
            lines += [f"enum {e.class_name} : uint32_t {{}};", ""]
            continue
        lines.append(f"enum {e.class_name} : uint32_t {{")
        lines += [f"    {e.class_name}_{layout.identifier(v.name)} = {v.number}," for v in e.values]
        lines += ["};", ""]
    return "\n".join([*lines, f"}}  // namespace {namespace}"]) + "\n"


def emit_all_header(structs, namespace):
    names = [f"{s.class_name}.h" for s in structs] + ["enums.h"]
    return "#pragma once\n\n" + "".join(f'#include "{namespace}/{n}"\n' for n in names)


def _dense(entries, size):
    """The lines of an array initialiser: `entries` maps index to (text, comment), all others are null."""
    lines, run = [], 0

    def flush():
        for start in range(0, run, _NULLS_PER_LINE):
            lines.append("    " + ", ".join(["none"] * min(_NULLS_PER_LINE, run - start)) + ",")

    for i in range(size):
        if i not in entries:
            run += 1
            continue
        flush()
        run = 0
        lines.append(f"    {entries[i][0]},  // {entries[i][1]}")
    flush()
    return lines


_NONE = "// Stands for an index without an entry.\nconstexpr decltype(nullptr) none = nullptr;\n"


def emit_enum_tables(enums):
    """`Enums.cpp`: names of every enumeration, and `Schema::vEnumDefG`.

    The underscore, which no enumeration's name has, keeps the two variables of `x` apart from those of `vX`.
    """
    lines = ['#include "sorn/model/Schema.h"', "", "namespace {", "", _NONE]
    for e in enums:
        values = {v.number: (f'"{v.name}"', v.number) for v in e.values}
        lines += [f"constinit const char* const v{e.class_name}G[{e.count}] = {{", *_dense(values, e.count), "};",
                  f"constinit const sorn::EnumDef {e.class_name}_defG = {{{e.count}, v{e.class_name}G}};", ""]
    size = max((e.id for e in enums), default=0) + 1
    entries = {e.id: (f"&{e.class_name}_defG", e.id) for e in enums}
    lines += ["}  // namespace", "", "namespace sorn {", "",
              f"const uint32_t Schema::nEnumDefG = {size};", "",
              f"constinit const EnumDef* const Schema::vEnumDefG[{size}] = {{", *_dense(entries, size), "};", "",
              "}  // namespace sorn"]
    return "\n".join(lines) + "\n"


def emit_schema(catalogue, namespace):
    """`Schema.cpp`: the constants, `Schema::vStructDefG` and the table from struct name to struct."""
    settings, structs = catalogue.settings, catalogue.structs
    size = max((s.id for s in structs), default=0) + 1
    by_id = {s.id: (f"&{namespace}::{s.class_name}::structInfoG", s.id) for s in structs}
    table = name_table(structs, settings["nameTableSize"])
    by_name = {i: (f"&{namespace}::{s.class_name}::structInfoG", i) for i, s in table.items()}
    lines = ['#include "sorn/model/Schema.h"', ""]
    lines += [f'#include "{namespace}/{s.class_name}.h"' for s in structs]
    lines += ["", "namespace {", "", _NONE, "}  // namespace", "", "namespace sorn {", ""]
    lines += [f"const int32_t Schema::{key}SchemaVersionG = {settings[key + 'Version']};"
              for key in ("first", "last", "default")]
    lines += ["", f"const uint32_t Schema::nStructDefG = {size};", "",
              f"constinit const StructInfo* const Schema::vStructDefG[{size}] = {{", *_dense(by_id, size), "};", "",
              f"const uint32_t Schema::structNameHashTableSizeG = {settings['nameTableSize']};", "",
              f"constinit const StructInfo* const Schema::structNameHashTableG[{settings['nameTableSize']}] = {{",
              *_dense(by_name, settings["nameTableSize"]), "};", "", "}  // namespace sorn"]
    return "\n".join(lines) + "\n"


def name_hash(name):
    h = 0
    for byte in name.encode():
        h = (h * 31 + byte) & 0xFFFFFFFF
    return h


def name_table(structs, size):
    """Index to struct: the structs in byte order of their names, each at its home entry or the next free one."""
    table = {}
    for s in sorted(structs, key=lambda s: s.name.encode()):
        i = name_hash(s.name) % size
        while i in table:
            i = (i + 1) % size
        table[i] = s
    return table
