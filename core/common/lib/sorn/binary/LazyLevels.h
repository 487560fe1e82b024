#pragma once

#include <cstdint>

#include "rox/ref.h"

class RoxMempool;

namespace sorn {

class Dictionary;

/// Lazy bodies inside lazy bodies, beyond which writing stops converting them: each one may have to be read
/// from its text, which holds all that are inside.
constexpr uint32_t maxLazyLevelsG = 1000;

/// What is written in place of a body beyond that: the dictionary of an error, in the pool.
ref<Dictionary> NewTooDeepError(RoxMempool* pool);

}  // namespace sorn
