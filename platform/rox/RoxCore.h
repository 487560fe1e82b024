#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <new>

#include "rox/RoxMempool.h"

/// Base of every reference-counted class. Made with `new (pool) X(...)` or, on the general heap, `new
/// X(...)`; the count begins at 0, and the object dies with its last `ref`. RoxCore must be the first base of
/// its classes.
///
/// The count is atomic: references to one object may be taken and dropped on any thread. All else in an
/// object belongs to one thread at a time.
class RoxCore {
 public:
    RoxCore(const RoxCore&) = delete;
    RoxCore& operator=(const RoxCore&) = delete;
    virtual ~RoxCore();

    /// The object as the class whose `classTagG` stands at `classTag`, or null if it is not one. A class that
    /// VkCast shall find overrides this: its own tag gives `this`, any other goes to its base.
    virtual void* VkCastHelper(const void* classTag);

    static const char classTagG;

    /// The pool that the object lives in; null for the general heap.
    RoxMempool* GetMempool() const { return pMempoolM; }
    uint32_t GetRefCount() const { return countM.load(std::memory_order_relaxed); }

    void UpRef() { countM.fetch_add(1, std::memory_order_relaxed); }

    /// The first reference on an object that nobody else has seen yet: without a read-modify-write.
    void UpRefFirst() { countM.store(1, std::memory_order_relaxed); }

    /// Takes 1 from the count and destroys the object when that leaves 0. Null does nothing. Destruction of
    /// chains of any length takes bounded stack: beyond a small depth, dying objects wait in a list of the
    /// thread, which the outermost DownRef empties before it returns. A pool that ends meanwhile sees to the
    /// waiting objects first.
    static void DownRef(RoxCore* p) {
        if (p == nullptr) {
            return;
        }
        // The only holder needs no read-modify-write: nobody else can reach the count.
        if (p->countM.load(std::memory_order_relaxed) == 1 ||
            p->countM.fetch_sub(1, std::memory_order_release) == 1) {
            Destroy(p);
        }
    }

    /// Destroys this thread's waiting objects, the latest first, until the pool has no live block or none
    /// waits. The pool's destructor calls it, for the waiting ones may lie in the pool or hold what does.
    /// Takes stack for each such call inside another: for a dying object that owns a pool which others keep
    /// in use.
    static void DestroyDeferred(const RoxMempool& pool);

    /// Allocates and leaves the pool in the raw memory for the constructor. Null pool: general heap.
    static void* operator new(size_t size, RoxMempool* pool);
    static void* operator new(size_t size);
    /// Destroys the object and frees it to where it came from.
    static void operator delete(RoxCore* p, std::destroying_delete_t);
    /// Free what the matching operator new gave when a constructor did not finish.
    static void operator delete(void* p, RoxMempool* pool);
    static void operator delete(void* p);

 protected:
    /// For objects made by this class's operator new only: takes the pool which that left in the memory.
    RoxCore();
    /// For objects in any memory: the pool is told.
    explicit RoxCore(RoxMempool* pool) : pMempoolM(pool), countM(0) {}

    RoxMempool* pMempoolM;
    std::atomic<uint32_t> countM;

 private:
    friend class RoxDeferredList;
    static void Destroy(RoxCore* p);
    static void DestroyNow(RoxCore* p);
};

static_assert(sizeof(void*) != 4 || sizeof(RoxCore) == 12,
              "the header of an object is three words on the target");
