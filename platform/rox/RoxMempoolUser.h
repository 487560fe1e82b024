#pragma once

#include <cstdint>

/// Tag of the library on whose behalf a container allocates. Bookkeeping only.
using RoxMempoolUser = uint8_t;

constexpr RoxMempoolUser roxMempoolUserNone = 0;
constexpr RoxMempoolUser roxMempoolUserSorn = 3;
