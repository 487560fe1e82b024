#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <new>

#include "rox/RoxMempool.h"

/// The shared representation of non-empty RoxStrings: this header and, in the same block, the bytes and a
/// NUL. Bytes never change; the count and the cached hash are atomic, so representations may be shared
/// between threads. A null pointer stands for the empty text in every operation here.
class RoxStringRepN {
 public:
    /// A representation of n > 0 bytes (uninitialised, NUL set behind them) with a count of 1; the caller
    /// fills it through MutableBytes before anybody else sees it. As in the pool, a size that cannot be ends
    /// in RoxAssertFail.
    static RoxStringRepN* New(RoxMempool* pool, uint32_t n) {
        RoxStringRepN* rep = new (RoxMempool::MallocIn(pool, BlockBytes(pool, n))) RoxStringRepN(pool, n);
        rep->MutableBytes()[n] = 0;
        return rep;
    }

    /// For the maker, before anybody else sees it: the same with n > 0 bytes, the first of them kept; it may
    /// move.
    static RoxStringRepN* Resize(RoxStringRepN* rep, uint32_t n);

    RoxMempool* GetMempool() const { return pMempoolM; }
    uint32_t GetLength() const { return lengthM; }
    const char* GetBytes() const { return reinterpret_cast<const char*>(this) + bytesOffset; }
    char* MutableBytes() { return reinterpret_cast<char*>(this) + bytesOffset; }

    /// The keyed hash of the bytes, computed once. Never 0.
    uint32_t GetHash() const {
        uint32_t hash = hashM.load(std::memory_order_relaxed);
        return hash != 0 ? hash : ComputeHash();
    }

    void UpRef() { countM.fetch_add(1, std::memory_order_relaxed); }
    /// Takes 1 from the count and frees the representation when that leaves 0.
    void DownRef() {
        if (countM.load(std::memory_order_relaxed) == 1 ||
            countM.fetch_sub(1, std::memory_order_release) == 1) {
            Delete();
        }
    }

 private:
    RoxStringRepN(RoxMempool* pool, uint32_t n) : pMempoolM(pool), countM(1), lengthM(n), hashM(0) {}
    ~RoxStringRepN() = default;
    static size_t BlockBytes(const RoxMempool* pool, uint32_t n) {
        uint64_t bytes = uint64_t{bytesOffset} + n + 1;
        if (bytes != static_cast<size_t>(bytes)) {
            FailTooLong(pool, n);  // on a 32-bit host only
        }
        return static_cast<size_t>(bytes);
    }
    [[noreturn]] static void FailTooLong(const RoxMempool* pool, uint32_t n);
    uint32_t ComputeHash() const;
    void Delete();

    RoxMempool* pMempoolM;
    std::atomic<uint32_t> countM;
    uint32_t lengthM;
    mutable std::atomic<uint32_t> hashM;  // 0: not yet computed

    static constexpr size_t bytesOffset = sizeof(void*) + 3 * sizeof(uint32_t);
};
