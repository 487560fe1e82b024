#include "sorn/model/OrvoVersion.h"

#include <gtest/gtest.h>

#include "sorn/model/FieldInfo.h"

namespace sorn {
namespace {

TEST(OrvoVersion, ZeroIsNoVersion) {
    EXPECT_TRUE(OrvoVersion().FAbsent());
    EXPECT_TRUE(OrvoVersion(0).FAbsent());
    EXPECT_FALSE(OrvoVersion(7).FAbsent());
    EXPECT_FALSE(OrvoVersion(-1).FAbsent());
    EXPECT_EQ(OrvoVersion(42).Number(), 42);
    EXPECT_TRUE(OrvoVersion(7) == 7);
    EXPECT_TRUE(OrvoVersion(7) != 8);
}

TEST(FieldInfo, HoldsBetweenItsVersionsInclusive) {
    const FieldInfo field = {10, 20, SORN_DATA_TYPE_S32, SORN_ARITY_OPTIONAL, 0, 0, 0, 0};
    const struct {
        int version;
        bool fHolds;
    } cases[] = {{0, true},  {9, false},  {10, true},  {15, true},
                 {20, true}, {21, false}, {-1, false}, {266, false}};
    for (const auto& each : cases) EXPECT_EQ(field.FHoldsIn(each.version), each.fHolds) << each.version;
}

}  // namespace
}  // namespace sorn
