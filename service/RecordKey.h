#pragma once

#include <string>
#include <string_view>

#include "sorn/model/SornObject.h"

namespace sorn::service {

/// What tells a record from others of its type, as text: the id of its own, which is the field for a single
/// id of that very struct ("recordingId" of a recording); where the struct has none, the values of the fields
/// that the struct's remove request names. A record that has neither is told by its text, so that the same
/// record stored again is one.
std::string RecordKey(const SornObject& record, OrvoVersion version, std::string_view text);

}  // namespace sorn::service
