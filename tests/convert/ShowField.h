#pragma once

#include <string>
#include <vector>

#include "sorn/model/FieldInfo.h"
#include "sorn/model/SornObject.h"

namespace sorntest {

/// The raw values of a field's member, each as a short text of its own notation, read without the library's
/// walks: "7/-2" a channel, "USD/100" a currency, "01ff" bytes, "7" a number or a count, "null", "dict JSON",
/// "object JSON" ...
std::vector<std::string> ShowField(const sorn::SornObject& object, const sorn::FieldInfo& field);

}  // namespace sorntest
