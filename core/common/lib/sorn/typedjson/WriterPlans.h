#pragma once

#include <cstdint>

#include "sorn/convert/StructTable.h"
#include "sorn/typedjson/WriterPlan.h"

namespace sorn {

/// Finds the plans of structs for one writer. Those of the schema's table are made by the first object that
/// is written and shared by the whole process on the general heap; those of a table of the caller's live as
/// long as this object.
class WriterPlans {
 public:
    explicit WriterPlans(StructTable table);
    WriterPlans(const WriterPlans&) = delete;
    WriterPlans& operator=(const WriterPlans&) = delete;
    ~WriterPlans() {
        if (pFirstM != nullptr) DeleteOwn();
    }

    /// The plan of a struct by its id; null for an id that is not in the table.
    const WriterPlan* Of(uint32_t structId) { return isSharedM ? OfSchema(structId) : OfTable(structId); }
    StructTable GetTable() const { return tableM; }

    /// Deletes all plans that are shared. Not while a conversion is going on. At the end of the process it
    /// happens by itself.
    static void DestroyAll();

 private:
    /// A plan of this object's own.
    struct Own {
        WriterPlan* pPlan;
        Own* pNext;
    };

    /// Any thread, no lock.
    static const WriterPlan* OfSchema(uint32_t structId);
    const WriterPlan* OfTable(uint32_t structId);
    void DeleteOwn();

    StructTable tableM;
    bool isSharedM;
    Own* pFirstM = nullptr;
};

}  // namespace sorn
