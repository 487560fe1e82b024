#pragma once

#include <cstddef>

class RoxMempoolState;

/// A memory pool: an allocator of its own with exact bookkeeping.
///
/// Blocks come in size classes: multiples of 8 up to 128 bytes, of 16 up to 256, then four classes to each
/// doubling up to 16,384 bytes. Larger blocks are mapped one by one in whole pages of 4,096 bytes. A block is
/// aligned to 8 bytes, and to 16 when its class is a multiple of 16, which covers every type that asks for at
/// most 16 and whose size is the requested one. More than 16 is never promised.
///
/// Every operation may be called from any thread at any time. The thread that allocates first becomes the
/// pool's owner and takes no lock and no atomic read-modify-write; when it ends, another thread takes its
/// place. The constructor and the destructor must not run at the same time as anything else on the pool.
///
/// No operation gives null: exhausted memory or an impossible size ends in RoxAssertFail with the pool's name
/// and the size. When built with AddressSanitizer all memory outside live blocks is poisoned, the bytes of a
/// block beyond the requested size too, and a redzone stands behind each block (which makes blocks larger).
class RoxMempool {
 public:
    /// An empty pool; `name` (copied) shows in reports. No memory is mapped before the first allocation.
    explicit RoxMempool(const char* name);
    /// Destroys counted objects of this thread that only wait for their destruction, if they may use the pool
    /// (RoxCore::DestroyDeferred). Then gives everything back to the system; blocks that still live are gone
    /// with the pool. If there are any, the leak reporter is called first.
    ~RoxMempool();
    RoxMempool(const RoxMempool&) = delete;
    RoxMempool& operator=(const RoxMempool&) = delete;

    /// n bytes, not cleared. 0 bytes give a block of the smallest class.
    [[nodiscard]] void* Malloc(size_t n) __attribute__((malloc, alloc_size(2), returns_nonnull));
    /// n bytes, cleared.
    [[nodiscard]] void* Calloc(size_t n) __attribute__((malloc, alloc_size(2), returns_nonnull));
    /// Resizes a block of this pool, keeping the contents up to the smaller of the two sizes; the block may
    /// move. Null `p` is Malloc.
    [[nodiscard]] void* Realloc(void* p, size_t n) __attribute__((alloc_size(3), returns_nonnull));
    /// Releases a block of this pool. Null is allowed.
    void Free(void* p);

    /// Bytes of all live blocks, by their class (not by the requested size).
    size_t GetUsedBytes() const;
    /// Bytes taken from the system that are not in live blocks.
    size_t GetUnusedBytes() const;
    /// The most that GetUsedBytes has ever been.
    size_t GetUsedBytesHighWater() const;
    /// The same figure as GetUsedBytesHighWater.
    size_t GetHighWaterUsedBytes() const;
    const char* GetName() const;

    /// The same on a pool that may be null: null stands for the general heap of the C library.
    [[nodiscard]] __attribute__((malloc, alloc_size(2), returns_nonnull)) static void* MallocIn(
        RoxMempool* poolOrNull, size_t n) {
        return poolOrNull != nullptr ? poolOrNull->Malloc(n) : HeapMalloc(n);
    }
    [[nodiscard]] static void* CallocIn(RoxMempool* poolOrNull, size_t n)
        __attribute__((malloc, alloc_size(2), returns_nonnull));
    [[nodiscard]] static void* ReallocIn(RoxMempool* poolOrNull, void* p, size_t n)
        __attribute__((alloc_size(3), returns_nonnull));
    static void FreeIn(RoxMempool* poolOrNull, void* p) {
        if (poolOrNull != nullptr) {
            poolOrNull->Free(p);
        } else {
            HeapFree(p);
        }
    }

    using LeakReporter = void (*)(const char* poolName, size_t nBlocks, size_t nBytes);
    /// Sets what every pool's destructor calls when blocks still live; null (as at start) for nothing.
    /// Process-wide.
    static void SetLeakReporter(LeakReporter reporter);

    /// Bytes that all pools of the process together hold from the system at this moment.
    static size_t GetSystemBytes();

 private:
    static void* HeapMalloc(size_t n);
    static void HeapFree(void* p);

    RoxMempoolState* pStateM;
};
