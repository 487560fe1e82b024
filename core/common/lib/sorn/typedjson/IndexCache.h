#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>

namespace sorn {

/// What is worked out of constant metadata, by the address of that: made by the first question, never changed
/// afterwards, shared by all threads without a lock. For constinit variables; they end with DestroyAll.
///
/// Index: `static Index* New(const Source&)`, null for a source that has none; `static void Delete(Index*)`;
/// `const Source& GetSource() const`.
template <class Source, class Index, unsigned nPlaceBits>
class IndexCache {
 public:
    /// Null also when there are too many.
    const Index* Of(const Source& source) {
        // Sources lie one behind another: multiplication spreads what the low bits have.
        const uint64_t address = reinterpret_cast<uintptr_t>(&source) / alignof(Source);
        size_t place = static_cast<size_t>(address * 0x9E3779B97F4A7C15 >> (64 - nPlaceBits));
        for (unsigned i = 0; i < nProbesG; ++i, place = (place + 1) % nPlacesG) {
            const Index* const index = vIndexM[place].load(std::memory_order_acquire);
            if (index != nullptr && &index->GetSource() == &source) [[likely]]
                return index;
            if (index == nullptr) return MakeAt(place, source);
        }
        return nullptr;
    }

    /// Not while another operation is going on.
    void DestroyAll() {
        for (std::atomic<Index*>& place : vIndexM) {
            Index* const index = place.exchange(nullptr, std::memory_order_acq_rel);
            if (index != nullptr) Index::Delete(index);
        }
    }

 private:
    static constexpr size_t nPlacesG = size_t{1} << nPlaceBits;
    static constexpr unsigned nProbesG = 16;

    // Two threads may make the same index at once: one of them puts it in its place, the other drops its own.
    // The place may also have gone to the index of another source: then there is one place less to try.
    __attribute__((noinline)) const Index* MakeAt(size_t place, const Source& source) {
        Index* const index = Index::New(source);
        if (index == nullptr) return nullptr;
        Index* found = nullptr;
        if (vIndexM[place].compare_exchange_strong(found, index, std::memory_order_acq_rel,
                                                   std::memory_order_acquire)) {
            return index;
        }
        Index::Delete(index);
        return &found->GetSource() == &source ? found : Of(source);
    }

    std::atomic<Index*> vIndexM[nPlacesG] = {};
};

}  // namespace sorn
