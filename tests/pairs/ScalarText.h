#pragma once

#include <string>

#include "pairs/Record.h"

namespace sorntest {

/// The text of a scalar value (bytes included) in dictionaries and JSON, before quoting.
std::string ScalarText(const sorn::FieldInfo& field, const Value& value);

enum class Strictness {
    dictionary,  ///< of a dictionary's text: numbers in range, bad channels and the like kept
    typed,       ///< of the typed reader: numbers as they are scanned, bad channels and currencies refused
};

/// The value of a scalar's text; false and the innermost words when it has none.
bool ParseScalar(const sorn::FieldInfo& field, const std::string& text, Strictness strictness, Value& out,
                 std::string& words);

std::string Base64Text(const std::string& bytes);

}  // namespace sorntest
