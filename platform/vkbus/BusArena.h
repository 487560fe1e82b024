#pragma once

#include <cstddef>
#include <utility>

#include "vkbus/BusTypes.h"

/// Memory of one decoded record, in blocks from its library's allocate; all released together.
class BusArena {
 public:
    explicit BusArena(const VkBusTypeLibrary& library) : pLibraryM(&library) {}
    ~BusArena();
    /// The memory changes hands.
    BusArena(BusArena&& other) noexcept
        : pLibraryM(other.pLibraryM),
          pFirstM(std::exchange(other.pFirstM, nullptr)),
          pFreeM(std::exchange(other.pFreeM, nullptr)),
          nFreeM(std::exchange(other.nFreeM, 0)) {}
    BusArena(const BusArena&) = delete;
    BusArena& operator=(const BusArena&) = delete;

    /// Cleared memory, aligned to 8 bytes; it lives as long as the arena. Exhausted memory ends the process.
    void* Take(size_t nBytes);

 private:
    struct Block {
        Block* pNext;
    };
    static constexpr size_t headG = (sizeof(Block) + 7) / 8 * 8;
    static constexpr size_t blockBytesG = 1024;

    const VkBusTypeLibrary* pLibraryM;
    Block* pFirstM = nullptr;
    unsigned char* pFreeM = nullptr;
    size_t nFreeM = 0;
};
