#include "rox/RoxCore.h"

#include "rox/RoxAssert.h"

namespace {

/// The word of a raw object that the constructor will fill with the pool.
RoxMempool** PoolWord(void* object) {
    // The compiler may take memory for undefined before its constructor has run; this hides where the pointer
    // leads.
    __asm__ volatile("" : "+r"(object) : : "memory");
    return static_cast<RoxMempool**>(object) + 1;
}

// Recursion of destructors beyond this goes to the list. A level takes some 200 bytes of stack.
constexpr unsigned maxDepth = 16;

struct DestroyState {
    unsigned depth;
    RoxCore* pDeferred;
};

__thread DestroyState destroyStateG __attribute__((tls_model("initial-exec")));

}  // namespace

/// Objects whose count fell to 0 and that wait for their destruction, linked through their own dead fields: a
/// 32-bit address fits the count. Of a 64-bit one, less the three low bits which alignment keeps 0, 32 bits
/// go there and 16 into the top of the pool's word, which addresses of user space leave free.
class RoxDeferredList {
 public:
    static void Push(RoxCore*& first, RoxCore* p) {
        uint64_t link = reinterpret_cast<uintptr_t>(first);
        if constexpr (sizeof(void*) == 8) {
            uintptr_t pool = reinterpret_cast<uintptr_t>(p->pMempoolM);
            link >>= 3;
            RoxAssert(link >> 48 == 0 && static_cast<uint64_t>(pool) >> 48 == 0,
                      "RoxCore: address above 48 bits");
            p->pMempoolM = reinterpret_cast<RoxMempool*>(pool | static_cast<uintptr_t>(link >> 32 << 48));
        }
        p->countM.store(static_cast<uint32_t>(link), std::memory_order_relaxed);
        first = p;
    }

    static RoxCore* Pop(RoxCore*& first) {
        RoxCore* p = first;
        uint64_t link = p->countM.load(std::memory_order_relaxed);
        if constexpr (sizeof(void*) == 8) {
            uint64_t pool = reinterpret_cast<uintptr_t>(p->pMempoolM);
            link = (link | pool >> 48 << 32) << 3;
            p->pMempoolM = reinterpret_cast<RoxMempool*>(static_cast<uintptr_t>(pool << 16 >> 16));
        }
        first = reinterpret_cast<RoxCore*>(static_cast<uintptr_t>(link));
        return p;
    }
};

const char RoxCore::classTagG = 0;

RoxCore::RoxCore() : pMempoolM(*PoolWord(this)), countM(0) {}

RoxCore::~RoxCore() = default;

void* RoxCore::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : nullptr;
}

void* RoxCore::operator new(size_t size, RoxMempool* pool) {
    void* p = RoxMempool::MallocIn(pool, size);
    *PoolWord(p) = pool;
    __asm__ volatile("" : : "r"(p) : "memory");
    return p;
}

void* RoxCore::operator new(size_t size) {
    return operator new(size, nullptr);
}

void RoxCore::operator delete(RoxCore* p, std::destroying_delete_t) {
    DestroyNow(p);
}

void RoxCore::operator delete(void* p, RoxMempool* pool) {
    RoxMempool::FreeIn(pool, p);
}

void RoxCore::operator delete(void* p) {
    RoxMempool::FreeIn(nullptr, p);
}

void RoxCore::DestroyNow(RoxCore* p) {
    RoxMempool* pool = p->pMempoolM;
    // A destructor that takes and drops a reference to its own object must not destroy it again.
    p->countM.store(1, std::memory_order_relaxed);
    p->~RoxCore();
    RoxMempool::FreeIn(pool, p);
}

void RoxCore::DestroyDeferred(const RoxMempool& pool) {
    DestroyState& state = destroyStateG;
    // Not beyond what the pool needs: were all destroyed whose destructors have pools of their own, each
    // would do so for the next, on ever more stack.
    while (state.pDeferred != nullptr && pool.GetUsedBytes() != 0) {
        DestroyNow(RoxDeferredList::Pop(state.pDeferred));
    }
}

void RoxCore::Destroy(RoxCore* p) {
    p->countM.load(std::memory_order_acquire);  // what other holders did to the object comes before its end
    DestroyState& state = destroyStateG;
    if (state.depth == maxDepth) {
        RoxDeferredList::Push(state.pDeferred, p);
        return;
    }
    ++state.depth;
    DestroyNow(p);
    if (state.depth == 1) {
        while (state.pDeferred != nullptr) {
            DestroyNow(RoxDeferredList::Pop(state.pDeferred));
        }
    }
    --state.depth;
}
