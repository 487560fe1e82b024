#pragma once

#include <cstdint>
#include <string>

#include "service/Conditions.h"
#include "service/Failure.h"
#include "service/Limits.h"
#include "service/RequestPlans.h"

namespace sorn::service {

/// One search: which records, and which part of them.
struct Query {
    const RequestPlan* pPlan = nullptr;
    Conditions conditions;
    uint32_t offset = 0;  // records that meet the conditions and are left out in front
    uint32_t count = 0;   // the most that are given

    /// Of a search object at a version. A negative offset counts as 0, a negative count as 0, and no count as
    /// the largest. False for a query that is larger than the limits allow.
    bool Set(const RequestPlan& plan, const SornObject& search, OrvoVersion version, const Limits& limits,
             Failure& failure);
    /// Bytes that are equal for queries with equal answers.
    std::string Identity() const;
};

/// Whether the conditions keep the limits of a query.
bool FWithinLimits(const Conditions& conditions, const Limits& limits, Failure& failure);

}  // namespace sorn::service
