#include "rox/RoxThreadRecord.h"

#include <cstdlib>
#include <new>

#include "rox/RoxAssert.h"

constinit RoxThreadRecord RoxThreadRecord::endedThreadG{false};
constinit RoxThreadRecord RoxThreadRecord::noThreadG{false};
__thread RoxThreadRecord* RoxThreadRecord::pCurrentM = nullptr;

/// Its destructor runs when the thread ends.
class RoxThreadEnd {
 public:
    RoxThreadEnd() = default;
    RoxThreadEnd(const RoxThreadEnd&) = delete;
    RoxThreadEnd& operator=(const RoxThreadEnd&) = delete;
    ~RoxThreadEnd() {
        RoxThreadRecord* record = pRecordM;
        RoxThreadRecord::pCurrentM = RoxThreadRecord::EndedThread();
        record->fAliveM.store(false, std::memory_order_release);
        record->DownRef();
    }
    void Watch(RoxThreadRecord* record) { pRecordM = record; }

 private:
    RoxThreadRecord* pRecordM = nullptr;
};

void RoxThreadRecord::DownRef() {
    if (this != &endedThreadG && this != &noThreadG && nRefsM.fetch_sub(1, std::memory_order_acq_rel) == 1) {
        free(this);
    }
}

RoxThreadRecord* RoxThreadRecord::MakeCurrent() {
    void* memory = malloc(sizeof(RoxThreadRecord));
    if (memory == nullptr) {
        RoxAssertFail("out of memory: the record of a thread, %zu bytes", sizeof(RoxThreadRecord));
    }
    static thread_local RoxThreadEnd endG;
    pCurrentM = new (memory) RoxThreadRecord(true);
    endG.Watch(pCurrentM);
    return pCurrentM;
}
