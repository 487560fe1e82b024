#pragma once

#include <cstdint>

/// Place of a lock in the order of locks: a thread takes them ascending. It tells readers; nothing checks it.
using RoxLockLevel = uint32_t;
