#pragma once

#include <string>

#include "service/Failure.h"
#include "service/Limits.h"
#include "service/Query.h"
#include "service/Records.h"

namespace sorn::service {

/// Sets the text of the list that answers a query: the texts of its records joined as they are, not read.
/// Where the list has such fields, "anchorIndex" is the place of its first record among all that meet the
/// query, and "isTop" and "isBottom" tell that none stand before and behind. False when there is no such
/// list, as when it would be longer than an answer may be.
bool WriteList(Records& records, const Query& query, const Limits& limits, std::string& text,
               Failure& failure);

}  // namespace sorn::service
