#pragma once

#include "rox/RoxLockLevel.h"

/// The locks of the bus in their order. They come after those of the layers above, which may hold their own
/// while they send.
struct BusLockLevel {
    static constexpr RoxLockLevel endpointG = 500'000;  // a connection or listener, with all of its sessions
    static constexpr RoxLockLevel handlesG = 500'001;   // a leaf
    static constexpr RoxLockLevel addressG = 500'002;   // a leaf
};
