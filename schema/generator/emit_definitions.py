"""The definitions of a group of records' classes: tables, constructor, destructor, Factory."""

import datatypes
import layout

# Records are compiled in groups of about so many fields, so that two cores stay busy and no file takes long.
FIELDS_PER_FILE = 240

_PROLOGUE = """
// Parameters end in an underscore, as no field name does: `id` would hide a member of some classes.
// The classes have bases and virtual operations; both compilers lay them out so that offsetof holds.
#pragma GCC diagnostic ignored "-Winvalid-offsetof"

namespace {

// Fills the two members that are not constant data when the library is loaded.
struct Loader {
    Loader(sorn::StructInfo& info, int32_t nFields, const char* pFieldNames) {
        info.nFields = nFields;
        info.pFieldNames = pFieldNames;
    }
};

}  // namespace
"""


def group(structs):
    """Pairs of file stem and records: one or more files for each family."""
    families = {}
    for s in structs:
        families.setdefault(s.family, []).append(s)
    for family, members in sorted(families.items()):
        total = sum(len(s.fields) for s in members)
        n_files = max(1, round(total / FIELDS_PER_FILE))
        parts, taken = [[] for _ in range(n_files)], 0
        for s in members:
            parts[min(n_files - 1, taken * n_files // max(1, total))].append(s)
            taken += len(s.fields)
        for number, part in enumerate((p for p in parts if p), 1):
            yield f"{family}{number}", part


def emit(structs, namespace, catalogue):
    """The text of the source file, without its first line."""
    includes = "".join(f'#include "{namespace}/{s.class_name}.h"\n' for s in structs)
    includes = "#include <cstddef>\n\n" + '#include "rox/RoxMempool.h"\n' + includes
    body = "\n".join(_definitions(s, catalogue) for s in structs)
    return f"{includes}{_PROLOGUE}\nnamespace {namespace} {{\n\n{body}\n}}  // namespace {namespace}\n"


def _definitions(struct, catalogue):
    placed = layout.Layout(struct)
    name = struct.class_name
    lines = [f"// {'-' * 100}", f"// {struct.name}", ""]
    lines += _names(struct)
    lines += _field_infos(struct, placed, catalogue)
    lines += _histories(struct, placed, catalogue)
    prefix = f'"{struct.prefix}"' if struct.prefix else "nullptr"
    lines += [
        f"constinit sorn::StructInfo {name}::structInfoG = {{",
        f'    "{struct.name}", {prefix}, 0, vFieldInfoG, vFieldInfoHistoryG, nullptr, &{name}::Factory}};',
        f"static const Loader load{name}G({name}::structInfoG, {struct.slots}, {name}::pFieldNamesG);",
        "",
    ]
    lines += _constructor(struct, placed)
    lines += [f"{name}::~{name}() = default;", ""]
    lines += [
        f"ref<sorn::SornObject> {name}::Factory(RoxMempool* pool_) {{",
        f"    return ref<sorn::SornObject>::First(new (pool_) {name}());",
        "}",
        "",
    ]
    lines += _lock_owner(name, placed)
    lines += _layout_checks(name, placed)
    return "\n".join(lines)


def _names(struct):
    texts = [f'    "{f.name}\\0"' for f in struct.fields] or ['    ""']
    return [f"constinit const char* const {struct.class_name}::pFieldNamesG =", *texts[:-1], texts[-1] + ";", ""]


def _record(struct, placed, form, catalogue):
    name, m = struct.class_name, placed.member_of(form)
    presence = f"offsetof({name}, {m.presence})" if m.presence else "0"
    return (f"{{{form.first}, {form.last}, sorn::SORN_DATA_TYPE_{form.type.constant}, "
            f"sorn::SORN_ARITY_{form.arity.upper()}, {presence}, offsetof({name}, {m.name}), "
            f"{catalogue.type_id(form)}, {placed.name_offsets[form.slot]}}}")


def _field_infos(struct, placed, catalogue):
    fields = {f.slot: f for f in struct.fields}
    lines = [f"constinit const sorn::FieldInfo {struct.class_name}::vFieldInfoG[{struct.slots}] = {{"]
    for slot in range(struct.slots):
        if slot in fields:
            lines.append(f"    {_record(struct, placed, fields[slot].current, catalogue)},  // {slot}")
        else:
            lines.append(f"    {{0, 0, sorn::SORN_DATA_TYPE_NONE, sorn::SORN_ARITY_NONE, 0, 0, 0, 0}},  // {slot}")
    return lines + ["};", ""]


def _histories(struct, placed, catalogue):
    name = struct.class_name
    older = {f.slot: f.older for f in struct.fields if f.older}
    lines = []
    for slot, forms in older.items():
        lines.append(f"static constinit const sorn::FieldInfo v{name}Older{slot}G[{len(forms)}] = {{")
        lines += [f"    {_record(struct, placed, form, catalogue)}," for form in forms]
        lines += ["};", ""]
    table = f"constinit const sorn::FieldInfoHistory {name}::vFieldInfoHistoryG[{struct.slots}] ="
    if not older:
        return [f"{table} {{}};", ""]
    lines.append(f"{table} {{")
    for slot in range(struct.slots):
        text = f"{len(older[slot])}, v{name}Older{slot}G" if slot in older else "0, nullptr"
        lines.append(f"    {{{text}}},  // {slot}")
    return lines + ["};", ""]


def _initialiser(member):
    if not member.is_multi:
        return f"{member.name}()"
    container = member.form.type.container
    if container == datatypes.INT_ARRAY:
        return f"{member.name}({member.form.type.element}, pMempoolM, roxMempoolUserSorn)"
    if container == datatypes.STRING_ARRAY:
        return f"{member.name}(pMempoolM)"
    return f"{member.name}(pMempoolM, roxMempoolUserSorn)"


def _constructor(struct, placed):
    name = struct.class_name
    parts = ["sorn::SornObject(structIdG)"]
    parts += [f"{m.presence}(0)" for m in placed.members if m.presence]
    parts += [_initialiser(m) for m in placed.members]
    lines = [f"{name}::{name}()"]
    lines += [f"    {':' if i == 0 else ' '} {p}{',' if i + 1 < len(parts) else ' {}'}" for i, p in enumerate(parts)]
    return lines + [""]


def _lock_owner(name, placed):
    arrays = [m.name for m in placed.members if m.cpp_type == datatypes.STRING_ARRAY]
    lines = [f"void {name}::SetDebugLockOwner(RoxLockId id_) {{", "    sorn::SornObject::SetDebugLockOwner(id_);"]
    lines += [f"    {array}.SetDebugLockOwner(id_);" for array in arrays]
    return lines + ["}", ""]


def _layout_checks(name, placed):
    """Numbers fit their bits everywhere; on the 32-bit target every offset is the one computed here."""
    lines = [f"static_assert(sizeof({name}) <= {layout.MAX_STORAGE_OFFSET + 1});"]
    present = [m for m in placed.members if m.presence]
    if present:
        lines.append(f"static_assert(offsetof({name}, {present[-1].presence}) <= {layout.MAX_PRESENCE_OFFSET});")
    if placed.members:
        lines.append("#if __SIZEOF_POINTER__ == 4")
        lines += [f"static_assert(offsetof({name}, {m.presence}) == {m.presence_offset});" for m in present]
        lines += [f"static_assert(offsetof({name}, {m.name}) == {m.storage_offset});" for m in placed.members]
        lines += [f"static_assert(sizeof({name}) == {placed.size});", "#endif"]
    return lines + [""]
