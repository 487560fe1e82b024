#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <string_view>
#include <vector>

#include "rox/RoxMempool.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "service/Conditions.h"
#include "service/Failure.h"
#include "service/Limits.h"
#include "service/Store.h"
#include "sorn/model/SornObject.h"

namespace sorn::service {

/// The store's records as objects that can be compared. Objects are made when they are needed and kept as far
/// as the limit allows. One thread.
class Records {
 public:
    /// One side of a change: no record, one that is not decoded, or one that can be compared.
    struct Side {
        bool isRecord = false;
        OrvoVersion version;
        ref<SornObject> object;
    };
    /// A record that came, went, or took the place of one with its key.
    struct Change {
        const StructInfo* pType;
        Side before;
        Side after;
    };
    using Listener = std::function<void(const Change&)>;

    Records(Store& store, const Limits& limits) : storeM(store), limitsM(limits) {}
    Records(const Records&) = delete;
    Records& operator=(const Records&) = delete;

    /// Is told of every change when it was made.
    void SetListener(Listener listener) { listenerM = std::move(listener); }

    /// A text as a record whose text others may be given: it converts at the version, and every reader of
    /// JSON reads it. Null and words.
    ref<SornObject> ReadRecord(std::string_view text, OrvoVersion version, Failure& failure);
    /// Stores a record and the text that it was read from. One with its key is replaced.
    bool Put(const ref<SornObject>& record, OrvoVersion version, std::string_view text, Failure& failure);
    /// Removes the records of a type that meet the conditions.
    bool Remove(const StructInfo& type, const Conditions& conditions, Failure& failure);

    /// Changes up to EndBatch are stored together or not at all, and told together.
    bool BeginBatch(Failure& failure);
    bool EndBatch(Failure& failure);
    void DropBatch();
    /// Whether a failure of the store has ended the batch already.
    bool FBatchLost() const { return storeM.FBatchLost(); }

    /// Calls `take` with the numbers of the records of a type that meet the conditions, in the order of their
    /// insertion, until it gives false.
    bool Find(const StructInfo& type, const Conditions& conditions,
              const std::function<bool(int64_t number)>& take, Failure& failure);
    /// Hands the text of a record to `take`.
    bool Read(int64_t number, const std::function<void(std::string_view)>& take, Failure& failure) {
        return storeM.Read(number, take, failure);
    }

 private:
    struct Entry {
        int64_t number;
        OrvoVersion version;
        ref<SornObject> object;  // null while it is not decoded
    };
    using Table = std::vector<Entry>;  // ascending by number

    Table* GetTable(const StructInfo& type, Failure& failure);
    bool Decode(Entry& entry, ref<SornObject>& object, Failure& failure);
    void Keep(Entry& entry, const ref<SornObject>& object);
    void Tell(Change change);

    Store& storeM;
    const Limits limitsM;
    RoxMempool poolM{"sorn service records"};
    std::map<const StructInfo*, Table> tablesM;
    Listener listenerM;
    bool isBatchM = false;
    std::vector<Change> vPendingM;  // of a batch
};

}  // namespace sorn::service
