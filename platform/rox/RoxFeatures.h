#pragma once

#include "rox/VkFeature.h"

/// Which features of the platform are on in this process. All are off at the start; the host program sets
/// them. Any thread at any time; a change is seen by queries that come after it, and orders nothing else.
class RoxFeatures {
 public:
    /// Features from this number on are never on.
    static constexpr unsigned nFeaturesG = 1024;

    static bool FEnabled(VkFeature feature);
    /// Does nothing for numbers from nFeaturesG on.
    static void SetEnabled(VkFeature feature, bool enabled);
};
