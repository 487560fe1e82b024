#include "sorn/model/InternedString.h"

#include <new>

#include "rox/RoxMempool.h"
#include "rox/RoxSpinLock.h"
#include "rox/RoxSpinLockHold.h"
#include "sorn/model/SornHashTable.h"

namespace sorn {

namespace {

using KeyUtil = SornHashTableUtilTemplate<const char*>;
using ValueUtil = SornHashTableUtilTemplate<RoxString>;

/// Room for all names of the schema without a block; further names go into blocks of at most 256 bytes.
using StringTable =
    SornHashTable<const char*, RoxString, 3079, 256, KeyUtil::DefaultHash, KeyUtil::DefaultKeyCompare,
                  ValueUtil::DefaultValueCompare, KeyUtil::DefaultClear, ValueUtil::DefaultClear>;

static_assert(sizeof(void*) != 4 || sizeof(StringTable::Entry) == 20);
static_assert(sizeof(void*) != 4 || StringTable::blockHeaderBytesG == 8);
static_assert(sizeof(void*) != 4 || StringTable::nEntriesPerBlockG == 12);
static_assert(sizeof(void*) != 4 || sizeof(StringTable::Block) == 248);

constinit RoxSpinLock lockG(2);
constinit StringTable* pTableG = nullptr;  // under lockG

/// Ends the table with the process.
class SornHashTableDestructor {
 public:
    ~SornHashTableDestructor() { DestroyGlobalSornHashTable(); }
};

const SornHashTableDestructor destructorG;

}  // namespace

const RoxString* InternedString(RoxMempool* pool, const char* text) {
    const RoxSpinLockHold hold(lockG);
    if (pTableG == nullptr) {
        pTableG = new (RoxMempool::MallocIn(nullptr, sizeof(StringTable))) StringTable(pool);
    }
    RoxString* value = nullptr;
    if (!pTableG->Put(text, value)) *value = text;
    return value;
}

void DestroyGlobalSornHashTable() {
    const RoxSpinLockHold hold(lockG);
    if (pTableG == nullptr) return;
    pTableG->~StringTable();
    RoxMempool::FreeIn(nullptr, pTableG);
    pTableG = nullptr;
}

}  // namespace sorn
