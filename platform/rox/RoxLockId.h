#pragma once

#include <cstdint>

/// Tag of a debug lock owner; 0 stands for none.
using RoxLockId = uint32_t;
