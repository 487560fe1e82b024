#pragma once

#include <string>

/// All metadata of the schema as text: a line for each struct, slot, older variant, enumeration, value and
/// taken entry of the struct name table, in the order of their numbers. Nothing in it depends on the target.
std::string DumpMetadata();

/// The catalogue's word for a data type.
const char* DataTypeWord(unsigned dataType);
/// The catalogue's word for an arity.
const char* ArityWord(unsigned arity);
