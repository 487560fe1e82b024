#include "rox/RoxFeatures.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

namespace {

VkFeature Feature(unsigned number) {
    return static_cast<VkFeature>(number);
}

unsigned CountEnabled() {
    unsigned n = 0;
    for (unsigned number = 0; number < 2 * RoxFeatures::nFeaturesG; ++number) {
        if (RoxFeatures::FEnabled(Feature(number))) ++n;
    }
    return n;
}

// Each test leaves all features off.

TEST(FeaturesTest, OffAtTheStart) {
    EXPECT_EQ(0u, CountEnabled());
}

TEST(FeaturesTest, NamesHaveTheirNumbers) {
    EXPECT_EQ(207u, unsigned{VK_FEATURE_LAST_SCHEMA_VERSION});
    EXPECT_EQ(548u, unsigned{VK_FEATURE_TYPED_JSON});
}

TEST(FeaturesTest, OneByOne) {
    for (unsigned number : {0u, 1u, 31u, 32u, 207u, 548u, 1022u, 1023u}) {
        RoxFeatures::SetEnabled(Feature(number), true);
        EXPECT_TRUE(RoxFeatures::FEnabled(Feature(number))) << number;
        EXPECT_EQ(1u, CountEnabled()) << number;
        RoxFeatures::SetEnabled(Feature(number), true);
        EXPECT_TRUE(RoxFeatures::FEnabled(Feature(number))) << number;
        RoxFeatures::SetEnabled(Feature(number), false);
        EXPECT_EQ(0u, CountEnabled()) << number;
        RoxFeatures::SetEnabled(Feature(number), false);
        EXPECT_EQ(0u, CountEnabled()) << number;
    }
}

TEST(FeaturesTest, NeighboursStay) {
    RoxFeatures::SetEnabled(Feature(207), true);
    RoxFeatures::SetEnabled(Feature(208), true);
    RoxFeatures::SetEnabled(Feature(207), false);
    EXPECT_FALSE(RoxFeatures::FEnabled(Feature(207)));
    EXPECT_TRUE(RoxFeatures::FEnabled(Feature(208)));
    RoxFeatures::SetEnabled(Feature(208), false);
}

TEST(FeaturesTest, NumbersBeyondTheLimitAreNeverOn) {
    for (unsigned number : {1024u, 1024u + 548u, 65536u, 0x80000000u, 0xFFFFFFFFu}) {
        RoxFeatures::SetEnabled(Feature(number), true);
        EXPECT_FALSE(RoxFeatures::FEnabled(Feature(number))) << number;
    }
    EXPECT_EQ(0u, CountEnabled());
}

TEST(FeaturesTest, ThreadsThatSetNeighboursLoseNothing) {
    constexpr unsigned nThreads = 8;
    std::vector<std::thread> threads;
    for (unsigned i = 0; i < nThreads; ++i) {
        threads.emplace_back([i] {
            for (unsigned round = 0; round < 2001; ++round) {
                RoxFeatures::SetEnabled(Feature(i), round % 2 == 0);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(nThreads, CountEnabled());
    for (unsigned i = 0; i < nThreads; ++i) {
        RoxFeatures::SetEnabled(Feature(i), false);
    }
}

}  // namespace
