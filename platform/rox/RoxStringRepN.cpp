#include "rox/RoxStringRepN.h"

#include "rox/RoxAssert.h"
#include "rox/RoxHashBytes.h"
#include "rox/RoxMempool.h"

RoxStringRepN* RoxStringRepN::Resize(RoxStringRepN* rep, uint32_t n) {
    void* memory = RoxMempool::ReallocIn(rep->pMempoolM, rep, BlockBytes(rep->pMempoolM, n));
    RoxStringRepN* resized = static_cast<RoxStringRepN*>(memory);
    resized->lengthM = n;
    resized->MutableBytes()[n] = 0;
    return resized;
}

void RoxStringRepN::FailTooLong(const RoxMempool* pool, uint32_t n) {
    RoxAssertFail("out of memory: pool %s, text of %lu bytes",
                  pool != nullptr ? pool->GetName() : "(general heap)", static_cast<unsigned long>(n));
}

uint32_t RoxStringRepN::ComputeHash() const {
    uint32_t hash = RoxHashBytes(GetBytes(), lengthM);
    hashM.store(hash, std::memory_order_relaxed);
    return hash;
}

void RoxStringRepN::Delete() {
    countM.load(std::memory_order_acquire);  // what other holders did comes before the end
    RoxMempool* pool = pMempoolM;
    this->~RoxStringRepN();
    RoxMempool::FreeIn(pool, this);
}
