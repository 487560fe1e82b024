#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_map>

#include "sorn/model/StructInfo.h"

namespace sorn::service {

/// What the service does for requests of one type.
struct RequestPlan {
    enum Kind : uint8_t {
        SEARCH,  // XSearch, where the schema has X and XList: answered with an XList
        STORE,   // XStore and XUpdate: stores records X
        REMOVE,  // XRemove: removes records X
    };

    Kind kind;
    const StructInfo* pRecord;      // X
    const StructInfo* pList;        // XList, of a search
    const FieldInfo* pListRecords;  // its field that holds the records
};

/// The requests that the schema has by the names of its structs; no record is known by name. Constant.
class RequestPlans {
 public:
    RequestPlans();

    /// Null for a type of which only records are stored.
    const RequestPlan* Find(std::string_view requestType) const;

 private:
    void AddSearch(const StructInfo& record);
    void Add(const StructInfo& record, const char* suffix, RequestPlan::Kind kind);

    std::unordered_map<std::string, RequestPlan> plansM;
};

/// The field of a struct by its name as it holds in a version, or null.
const FieldInfo* FindField(const StructInfo& info, std::string_view name, OrvoVersion version);
/// Whether two fields hold the same kind of values: of one enumeration, ids or objects of one struct.
bool FSameValues(const FieldInfo& a, const FieldInfo& b);

}  // namespace sorn::service
