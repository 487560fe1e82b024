#pragma once

#include <cstdint>

#include "rox/RoxWorkStack.h"

namespace sorn {

/// An array that the typed reader is in. A byte each, since a text may open one with every byte.
enum class ObjectReaderLevel : uint8_t {
    FIRST_ELEMENT,
    LATER_ELEMENT,
    LONE_ELEMENT,    ///< no brackets: one bare element stands for the array
    ELEMENT_ITSELF,  ///< no array at all: the caller asked for one element
};

using ObjectReaderLevels = RoxWorkStack<ObjectReaderLevel, 64>;

}  // namespace sorn
