#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "pairs/Record.h"
#include "rox/RoxMempool.h"
#include "rox/RoxString.h"

namespace sorntest {

/// A test over a pool that must be as empty at the end as at the start.
class PairsFixture : public ::testing::Test {
 protected:
    void TearDown() override { EXPECT_EQ(pool.GetUsedBytes(), 0u) << "bytes left in the pool"; }

    RoxMempool pool{"pairs"};
};

/// Records of one struct for each: all structs of the catalogue, and those with every data type, companions
/// included. The environment variable SORN_PAIRS_SEEDS gives the number of random records of each struct,
/// else `nSeeds`.
void ForEachRecord(unsigned nSeeds, const std::function<void(const Record&, uint32_t seed)>& check);
void ForEachRecordOfEveryType(unsigned nSeeds,
                              const std::function<void(const Record&, uint32_t seed)>& check);

/// The versions at which the schema changes, and none.
inline const std::vector<int> allVersions = {0, 7, 11, 12, 21, 22, 25, 26, 42};

inline std::string Text(const RoxString& text) {
    return std::string(text.View());
}

/// Equality of long texts and bytes; a failure shows the surroundings of the first difference.
::testing::AssertionResult Same(const std::string& actual, const std::string& expected);

}  // namespace sorntest
