#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

/// The size classes of RoxMempool: multiples of 8 up to 128 bytes, of 16 up to 256, then four to each
/// doubling.
namespace roxmempool {

constexpr size_t chunkBytes =
    64 * 1024;  // chunks are aligned to their size, which leads from a block to its chunk
constexpr size_t pageBytes = 4 * 1024;
constexpr unsigned nPagesInChunk = chunkBytes / pageBytes;
constexpr size_t chunkHeaderBytes = 1024;  // the rest of a chunk's first page holds blocks
constexpr size_t largestSmallBytes = 16 * 1024;
constexpr unsigned nClasses = 48;

constexpr size_t ClassBytes(unsigned sizeClass) {
    if (sizeClass < 16) {
        return 8 * (size_t{sizeClass} + 1);
    }
    if (sizeClass < 24) {
        return 128 + 16 * (size_t{sizeClass} - 15);
    }
    unsigned doubling = (sizeClass - 24) / 4;
    return (size_t{256} << doubling) + (size_t{64} << doubling) * ((sizeClass - 24) % 4 + 1);
}

/// Pages of a run whose blocks leave at most an eighth of it unused.
constexpr unsigned ClassPages(unsigned sizeClass) {
    size_t bytes = ClassBytes(sizeClass);
    for (unsigned nPages = 1;; ++nPages) {
        size_t run = nPages * pageBytes;
        if (run >= bytes && run % bytes <= run / 8) {
            return nPages;
        }
    }
}

constexpr unsigned ComputeClass(size_t n) {
    unsigned sizeClass = 0;
    while (ClassBytes(sizeClass) < n) {
        ++sizeClass;
    }
    return sizeClass;
}

constexpr size_t tableBytes = 1024;  // sizes up to this are looked up, larger ones computed

constexpr auto classOfEighthG = [] {
    std::array<uint8_t, tableBytes / 8 + 1> table{};
    for (size_t i = 0; i < table.size(); ++i) {
        table[i] = static_cast<uint8_t>(ComputeClass(i * 8));
    }
    return table;
}();

constexpr auto classBytesG = [] {
    std::array<uint32_t, nClasses> table{};
    for (unsigned i = 0; i < nClasses; ++i) {
        table[i] = static_cast<uint32_t>(ClassBytes(i));
    }
    return table;
}();

constexpr auto classPagesG = [] {
    std::array<uint8_t, nClasses> table{};
    for (unsigned i = 0; i < nClasses; ++i) {
        table[i] = static_cast<uint8_t>(ClassPages(i));
    }
    return table;
}();

/// The smallest class that holds n <= largestSmallBytes bytes.
inline unsigned ClassOf(size_t n) {
    if (n <= tableBytes) [[likely]] {
        return classOfEighthG[(n + 7) / 8];
    }
    unsigned exponent = 31 - static_cast<unsigned>(__builtin_clz(static_cast<unsigned>(n - 1)));
    size_t beyond = (n - 1) - (size_t{1} << exponent);
    return 24 + 4 * (exponent - 8) + static_cast<unsigned>(beyond >> (exponent - 2));
}

static_assert(ClassBytes(nClasses - 1) == largestSmallBytes);

}  // namespace roxmempool
