"""The header of one record's class."""

import layout

_CONTAINER_HEADERS = {t: f"rox/{t}.h" for t in ("RoxGenericArray", "RoxGenericIntArray", "RoxStringArray")}
_FORWARD = {
    "ref<rox::ByteBuffer>": ("rox", "class ByteBuffer;"),
    "ref<sorn::Dict>": ("sorn", "class Dict;"),
    "ref<sorn::LazyDict>": ("sorn", "class LazyDict;"),
}


def emit(struct, namespace):
    """The text of the header, without its first line."""
    placed = layout.Layout(struct)
    lines = ["#pragma once", "", "#include <cstdint>", ""]
    lines += [f'#include "{h}"' for h in _headers(placed)]
    lines += [""] + _forward_declarations(placed)
    lines += [f"namespace {namespace} {{", ""]
    lines += _class(struct, placed)
    lines += ["", f"}}  // namespace {namespace}"]
    return "\n".join(lines) + "\n"


def _headers(placed):
    headers = {"sorn/model/SornObject.h", "sorn/model/StructInfo.h"}
    for m in placed.members:
        if m.is_multi:
            headers.add(_CONTAINER_HEADERS[m.form.type.container])
        elif m.form.type.header:
            headers.add(m.form.type.header)
    return sorted(headers)


def _forward_declarations(placed):
    names = {_FORWARD[m.cpp_type] for m in placed.members if m.cpp_type in _FORWARD}
    lines = []
    for namespace in sorted({n for n, _ in names}):
        lines += [f"namespace {namespace} {{", *sorted(d for n, d in names if n == namespace), "}", ""]
    return lines


def _class(struct, placed):
    prefix = f', id prefix "{struct.prefix}"' if struct.prefix else ""
    plural = "" if struct.slots == 1 else "s"
    lines = [
        f"/// Struct `{struct.name}`, id {struct.id}{prefix}, {struct.slots} slot{plural}.",
        f"class {struct.class_name} final : public sorn::SornObject {{",
        " public:",
        f"    static constexpr uint32_t structIdG = {struct.id};",
        "",
        f"    {struct.class_name}();",
        f"    ~{struct.class_name}() override;",
        "",
        "    /// An empty object in the pool.",
        "    static ref<sorn::SornObject> Factory(RoxMempool* pool);",
        "    void SetDebugLockOwner(RoxLockId id) override;",
        "",
        "    static sorn::StructInfo structInfoG;",
        f"    static const sorn::FieldInfo vFieldInfoG[{struct.slots}];",
        f"    static const sorn::FieldInfoHistory vFieldInfoHistoryG[{struct.slots}];",
        "    static const char* const pFieldNamesG;",
    ]
    present = [m for m in placed.members if m.presence]
    if present:
        lines += ["", "    // Whether an optional field is set: 0 or 1."]
        lines += [f"    unsigned char {m.presence};" for m in present]
    if placed.members:
        lines += [""] + [f"    {m.cpp_type} {m.name};  // {describe(m)}" for m in placed.members]
    return lines + ["};"]


def describe(member):
    """Such as `slot 14, multi object image, versions 7-42`."""
    form = member.form
    ref = f" {form.ref}" if form.ref else ""
    older = ", older form" if member.is_older else ""
    return f"slot {form.slot}, {form.arity} {form.type.word}{ref}, versions {form.first}-{form.last}{older}"
