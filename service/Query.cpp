#include "service/Query.h"

#include <algorithm>

#include "sorn/model/Schema.h"

namespace sorn::service {

namespace {

constexpr std::string_view offsetG = "offset";
constexpr std::string_view countG = "count";
constexpr std::string_view typeG = "type";

/// What is neither about paging nor about the request itself.
struct FilterFields final : Conditions::Fields {
    bool FWanted(const char* name) const override {
        return name != offsetG && name != countG && name != typeG;
    }
};

/// A number that a search may give, at least 0; `otherwise` when it does not.
uint32_t PagingNumber(const SornObject& search, OrvoVersion version, std::string_view name,
                      uint32_t otherwise) {
    const FieldInfo* const field = FindField(*Schema::vStructDefG[search.structId], name, version);
    if (field == nullptr || field->Type() != SORN_DATA_TYPE_S32 || field->arity == SORN_ARITY_MULTI ||
        (field->arity == SORN_ARITY_OPTIONAL && !search.FPresent(*field))) {
        return otherwise;
    }
    return static_cast<uint32_t>(std::max(*static_cast<const int32_t*>(search.MemberAt(*field)), 0));
}

}  // namespace

bool Query::Set(const RequestPlan& plan, const SornObject& search, OrvoVersion version, const Limits& limits,
                Failure& failure) {
    pPlan = &plan;
    conditions.Add(search, version, *plan.pRecord, FilterFields());
    offset = PagingNumber(search, version, offsetG, 0);
    count = std::min(PagingNumber(search, version, countG, limits.maxListRecords), limits.maxListRecords);
    return FWithinLimits(conditions, limits, failure);
}

std::string Query::Identity() const {
    std::string identity =
        std::string(pPlan->pList->name) + ' ' + std::to_string(offset) + ' ' + std::to_string(count) + ' ';
    conditions.AppendIdentity(identity);
    return identity;
}

bool FWithinLimits(const Conditions& conditions, const Limits& limits, Failure& failure) {
    std::string identity;
    conditions.AppendIdentity(identity);
    if (identity.size() <= limits.maxQueryBytes && conditions.CountObjects() <= limits.maxQueryObjects) {
        return true;
    }
    return failure.Set(ErrorCode::resourceUnavailableG, "the request names too many values to compare with");
}

}  // namespace sorn::service
