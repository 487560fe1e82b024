#pragma once

#include <string>

#include "sorn/model/SornObject.h"

namespace sorntest {

/// The compact JSON text that an object's dictionary has at a version, worked out a second time from the
/// metadata and the object's bytes, with none of the library's conversions, writers and text forms.
std::string ExpectedJson(const sorn::SornObject& object, int version);

}  // namespace sorntest
