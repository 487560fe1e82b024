#pragma once

#include <string>

#include "sorn/model/SornObject.h"

namespace sorntest {

/// What a read gives.
struct ReadOutcome {
    bool isRead;
    std::string words;
    std::string shown;  ///< as ShowObject; "null" without an object

    bool operator==(const ReadOutcome&) const = default;
};

/// An object's values and presence bytes, slot by slot, with all objects in it, in a notation of its own;
/// written by the metadata alone, without the library's walks. Lazy bodies show their text.
std::string ShowObject(const sorn::SornObject* object);

/// The typed reader worked out a second time, by plain recursion over a string, for texts of little depth.
ReadOutcome ModelRead(const std::string& text, const std::string& wordsBefore);

}  // namespace sorntest
