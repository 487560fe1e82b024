"""What the generator knows of each data type: its constant, its C++ members and their place on the 32-bit target."""

from dataclasses import dataclass

INT_ARRAY = "RoxGenericIntArray"
CORE_ARRAY = "RoxGenericArray"
STRING_ARRAY = "RoxStringArray"

# A multi container on the 32-bit target.
CONTAINER_SIZE = 16
CONTAINER_ALIGN = 4


@dataclass(frozen=True)
class DataType:
    word: str         # as the catalogue spells it
    constant: str     # behind SORN_DATA_TYPE_
    single: str       # C++ type of a single member
    size: int         # bytes of a single member on the 32-bit target
    align: int
    container: str    # C++ type of a multi member
    element: int = 0  # bytes of an element of a RoxGenericIntArray
    refers: str = ""  # "struct" or "enum" when the catalogue names one behind the word
    refOptional: bool = False
    header: str = ""  # what a single member needs to be included

    @property
    def is_reference(self):
        """A counted reference: an optional field of such a type has no presence byte."""
        return self.single.startswith("ref<")


_OBJECT = "ref<sorn::SornObject>"
_ID = {"refers": "struct", "refOptional": True}

_TYPES = (
    DataType("bool", "BOOL", "bool", 1, 1, INT_ARRAY, 1),
    DataType("bytes", "BYTESTRING", "ref<rox::ByteBuffer>", 4, 4, CORE_ARRAY),
    DataType("channel", "CHANNEL", "sorn::ChannelNumber", 8, 4, INT_ARRAY, 8, header="sorn/model/ChannelNumber.h"),
    DataType("currency", "CURRENCY", "sorn::Currency", 8, 4, INT_ARRAY, 8, header="sorn/model/Currency.h"),
    DataType("date", "DATE", "sorn::Date", 4, 4, INT_ARRAY, 4, header="sorn/model/Date.h"),
    DataType("datetime", "DATETIME", "sorn::DateTime", 8, 8, INT_ARRAY, 8, header="sorn/model/DateTime.h"),
    DataType("anydict", "ANY_DICT", "ref<sorn::Dict>", 4, 4, CORE_ARRAY),
    DataType("enum", "ENUM", "uint32_t", 4, 4, INT_ARRAY, 4, refers="enum"),
    DataType("float", "FLOAT", "double", 8, 8, INT_ARRAY, 8),
    DataType("intid", "INT_ID", "uint32_t", 4, 4, INT_ARRAY, 4, **_ID),
    DataType("longid", "LONG_ID", "uint64_t", 8, 8, INT_ARRAY, 8, **_ID),
    DataType("stringid", "STRING_ID", "RoxString", 4, 4, STRING_ARRAY, **_ID),
    DataType("knowndict", "KNOWN_DICT", _OBJECT, 4, 4, CORE_ARRAY),
    DataType("lazy", "KNOWN_DICT_AS_LAZY", "ref<sorn::LazyDict>", 4, 4, CORE_ARRAY),
    DataType("object", "OBJECT", _OBJECT, 4, 4, CORE_ARRAY, refers="struct"),
    DataType("s64", "S64", "int64_t", 8, 8, INT_ARRAY, 8),
    DataType("s32", "S32", "int32_t", 4, 4, INT_ARRAY, 4),
    DataType("string", "STRING", "RoxString", 4, 4, STRING_ARRAY),
    DataType("time", "TIME", "sorn::Time", 4, 4, INT_ARRAY, 4, header="sorn/model/Time.h"),
    DataType("u32", "U32", "uint32_t", 4, 4, INT_ARRAY, 4),
    DataType("u64", "U64", "uint64_t", 8, 8, INT_ARRAY, 8),
)

BY_WORD = {t.word: t for t in _TYPES}

ARITIES = ("optional", "required", "multi")
