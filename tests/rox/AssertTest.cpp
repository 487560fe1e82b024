#include <gtest/gtest.h>

#include <string>

#include "rox/RoxAssert.h"

TEST(AssertDeathTest, FailPrintsItsWordsAndAborts) {
    EXPECT_EXIT(RoxAssertFail("%s lacks %d of %d", "pool", 3, 4), testing::KilledBySignal(SIGABRT),
                "^assertion failed: pool lacks 3 of 4\n");
}

TEST(AssertDeathTest, LongWordsAreCutAtALine) {
    std::string text(5000, 'x');
    // 1,024 bytes in all: the prefix of 18, 1,005 of the text, the line end.
    EXPECT_DEATH(RoxAssertFail("%s", text.c_str()), "^assertion failed: x{1005}\n");
}

TEST(AssertDeathTest, FalseConditionPrintsItAsText) {
    EXPECT_DEATH(RoxAssert(false, "100%s"), "assertion failed: 100%s");
}

TEST(AssertTest, TrueConditionDoesNothing) {
    RoxAssert(true, "not reached");
    SUCCEED();
}
