#pragma once

#include <cstddef>

namespace sorntest {

/// What the program takes from the general heap, pools not included. Sanitizers have the heap for themselves:
/// with one of them all figures are 0.
struct HeapMeter {
    static bool FCounts();
    /// Bytes of all live blocks.
    static size_t Used();
    /// The most that Used has been since the last ResetPeak.
    static size_t Peak();
    static void ResetPeak();
};

}  // namespace sorntest
