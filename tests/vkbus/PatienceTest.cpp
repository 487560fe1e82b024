#include <gtest/gtest.h>
#include <time.h>

#include "BusFixture.h"
#include "vkbus/BusPatience.h"

namespace {

constexpr int64_t soonG = BusPatience::lookG - 1;
constexpr int64_t shortG = BusPatience::shortG - 1;

/// A wait that takes so long; whether it looked.
bool Wait(BusPatience& patience, int64_t nanoseconds) {
    const bool looked = patience.FLook();
    patience.Note(looked, nanoseconds);
    return looked;
}

/// Short waits until one looks, in vain.
unsigned WaitsUntilLook(BusPatience& patience) {
    unsigned n = 1;
    while (!Wait(patience, shortG)) {
        ++n;
    }
    return n;
}

TEST(Patience, LooksAfterShortWaitsOnly) {
    BusPatience patience(true);
    EXPECT_FALSE(Wait(patience, shortG + 1)) << "nothing is known yet";
    EXPECT_FALSE(Wait(patience, shortG)) << "the one before was long";
    EXPECT_TRUE(Wait(patience, soonG));
    EXPECT_TRUE(Wait(patience, soonG));
    EXPECT_TRUE(Wait(patience, INT64_MAX)) << "nobody can know that nothing comes";
    EXPECT_FALSE(Wait(patience, soonG));
}

TEST(Patience, LooksInVainMoreAndMoreSeldom) {
    BusPatience patience(true);
    Wait(patience, shortG);
    for (const unsigned nWaits : {1u, 2u, 4u, 8u, 16u, 32u, 64u, 64u}) {
        EXPECT_EQ(nWaits, WaitsUntilLook(patience));
    }
    while (!Wait(patience, soonG)) {
    }
    EXPECT_TRUE(Wait(patience, soonG)) << "one that found something forgives all";
}

TEST(Patience, NeverLooksOnASingleProcessor) {
    BusPatience patience(false);
    for (int i = 0; i < 200; ++i) {
        EXPECT_FALSE(Wait(patience, soonG));
    }
}

int64_t ThreadNanoseconds() {
    timespec now;
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return now.tv_sec * 1'000'000'000LL + now.tv_nsec;
}

class PatienceOnTheBus : public BusTest {};

TEST_F(PatienceOnTheBus, AWaitSleepsWhenNothingComes) {
    Service service;
    Client client;
    for (int i = 0; i < 200; ++i) {
        ASSERT_EQ("ping", client.RoundTrip("ping"));
    }
    const int64_t start = ThreadNanoseconds();
    EXPECT_EQ(VK_BUS_TIMED_OUT, client.Process(300'000'000));
    EXPECT_LT(ThreadNanoseconds() - start, 20'000'000);
}

}  // namespace
