#include "rox/RoxFeatures.h"

#include <atomic>
#include <cstdint>

namespace {

constexpr unsigned nWordBits = 32;
static_assert(RoxFeatures::nFeaturesG % nWordBits == 0);

std::atomic<uint32_t> vEnabledG[RoxFeatures::nFeaturesG / nWordBits];

}  // namespace

bool RoxFeatures::FEnabled(VkFeature feature) {
    const unsigned number = feature;
    if (number >= nFeaturesG) {
        return false;
    }
    return (vEnabledG[number / nWordBits].load(std::memory_order_relaxed) >> number % nWordBits & 1u) != 0;
}

void RoxFeatures::SetEnabled(VkFeature feature, bool enabled) {
    const unsigned number = feature;
    if (number >= nFeaturesG) {
        return;
    }
    std::atomic<uint32_t>& word = vEnabledG[number / nWordBits];
    const uint32_t bit = uint32_t{1} << number % nWordBits;
    if (enabled) {
        word.fetch_or(bit, std::memory_order_relaxed);
    } else {
        word.fetch_and(~bit, std::memory_order_relaxed);
    }
}
