#pragma once

#include <cstddef>
#include <cstdint>

/// Hash of n bytes, keyed with a random seed of the process, so that chosen texts cannot be made to collide.
/// Equal bytes give equal hashes in one process only; never 0. Thread-safe.
uint32_t RoxHashBytes(const void* bytes, size_t n);
