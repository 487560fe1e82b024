#pragma once

#include <string_view>

#include "service/Failure.h"
#include "service/Limits.h"
#include "service/Records.h"
#include "service/RequestBody.h"
#include "service/RequestPlans.h"

namespace sorn::service {

/// The requests that change records. All give false and words, with nothing changed.
class Changes {
 public:
    Changes(Records& records, RoxMempool& pool, const Limits& limits)
        : recordsM(records), poolM(pool), limitsM(limits) {}

    /// Stores the text of one record.
    bool Put(std::string_view text, OrvoVersion version, Failure& failure);
    /// Removes the records of the body's type that have the values of all its fields; at least one.
    bool Remove(const RequestBody& body, Failure& failure);
    /// A store or update request: stores the records that it holds in a field of their type, or else one made
    /// of the fields that request and record share.
    bool Store(const RequestPlan& plan, const RequestBody& body, Failure& failure);
    /// A remove request: removes the records that have the values of all fields that they share with it.
    bool RemoveBy(const RequestPlan& plan, const RequestBody& body, Failure& failure);

 private:
    bool PutAll(const std::vector<std::string>& vTexts, OrvoVersion version, Failure& failure);
    bool RemoveWhere(const StructInfo& type, const Conditions& conditions, Failure& failure);

    Records& recordsM;
    RoxMempool& poolM;
    const Limits limitsM;
};

}  // namespace sorn::service
