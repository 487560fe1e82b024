#pragma once

#include "rox/RoxLockLevel.h"

/// The locks of the client in their order; those of the bus come after them.
struct ClientLockLevel {
    static constexpr RoxLockLevel clientG = 452'610;  // responses on their way to a waiter or a callback
    static constexpr RoxLockLevel lifecycleG = 452'620;
    static constexpr RoxLockLevel tablesG = 600'000;     // a leaf
    static constexpr RoxLockLevel singletonG = 600'001;  // a leaf
};
