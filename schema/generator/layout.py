"""The order of a class's members, and where each lies on the 32-bit target.

Presence bytes come first, one for each optional field of a value type; then the members in ascending byte order of the
field names, each at its natural alignment. An older variant is a member of its own right before the current one.
"""

from dataclasses import dataclass

import datatypes

HEADER_SIZE = 16  # virtual table, pool, count, structId
MAX_PRESENCE_OFFSET = 511
MAX_STORAGE_OFFSET = 65535

# Names that a field cannot have, because every class has a member so named, of its own or of its bases.
RESERVED = {"structId", "pMempoolM", "countM", "classTagG",
            "structIdG", "structInfoG", "vFieldInfoG", "vFieldInfoHistoryG", "pFieldNamesG"}

# Names that a field cannot have, because the generated code or the headers that it includes give them a meaning: the
# template of the references, and macros of the C library.
TAKEN = {"ref", "assert", "errno", "linux", "offsetof", "stderr", "stdin", "stdout", "unix"}

# Names that a class cannot have: its own members, and what the generated code names without a namespace.
RESERVED_CLASSES = {"Factory", "SetDebugLockOwner", "Loader", "RoxCore", "RoxGenericArray", "RoxGenericIntArray",
                    "RoxLockId", "RoxMempool", "RoxString", "RoxStringArray"}

_KEYWORDS = set("""
alignas alignof and and_eq asm auto bitand bitor bool break case catch char char8_t char16_t char32_t class
co_await co_return co_yield compl concept const const_cast consteval constexpr constinit continue decltype
default delete do double dynamic_cast else enum explicit export extern false float for friend goto if inline
int long mutable namespace new noexcept not not_eq nullptr operator or or_eq private protected public
register reinterpret_cast requires return short signed sizeof static static_assert static_cast struct switch
template this thread_local throw true try typedef typeid typename union unsigned using virtual void volatile
wchar_t while xor xor_eq
""".split())


def identifier(text):
    """A value name as the tail of a C++ name."""
    return text.replace("-", "_").replace(".", "_")


@dataclass
class Member:
    form: object      # catalogue.Form
    is_older: bool
    name: str         # of the C++ member
    presence: str     # name of the presence byte, "" when there is none
    storage_offset: int = 0
    presence_offset: int = 0

    @property
    def is_multi(self):
        return self.form.arity == "multi"

    @property
    def cpp_type(self):
        return self.form.type.container if self.is_multi else self.form.type.single


def _member(form, is_older):
    name = form.name
    if is_older:
        first, last = form.versions or (form.first, form.last)
        name = f"{form.name}_{first}_{last}"
    presence = f"{name}_isSet" if form.has_presence_byte else ""
    return Member(form, is_older, name + "_" if name in _KEYWORDS else name, presence)


def _align(offset, alignment):
    return (offset + alignment - 1) // alignment * alignment


class Layout:
    """The members of a struct's class in declaration order, with their offsets on the 32-bit target."""

    def __init__(self, struct):
        self.members = []
        for f in sorted(struct.fields, key=lambda f: f.name.encode()):
            self.members += [_member(form, True) for form in f.older]
            self.members.append(_member(f.current, False))
        self._place()
        self._by_form = {id(m.form): m for m in self.members}
        self.name_offsets = {}  # slot -> offset of the field's name
        self.blob_size = 0
        for f in struct.fields:
            self.name_offsets[f.slot] = self.blob_size
            self.blob_size += len(f.name) + 1

    def member_of(self, form):
        return self._by_form[id(form)]

    def _place(self):
        offset = HEADER_SIZE
        self.last_presence_offset = 0
        for m in self.members:
            if m.presence:
                m.presence_offset = self.last_presence_offset = offset
                offset += 1
        largest = 4
        for m in self.members:
            size, alignment = m.form.type.size, m.form.type.align
            if m.is_multi:
                size, alignment = datatypes.CONTAINER_SIZE, datatypes.CONTAINER_ALIGN
            offset = _align(offset, alignment)
            m.storage_offset = offset
            offset += size
            largest = max(largest, alignment)
        self.size = _align(offset, largest)
