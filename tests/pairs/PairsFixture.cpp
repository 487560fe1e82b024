#include "pairs/PairsFixture.h"

#include <cstdlib>

#include "pairs/RandomModel.h"
#include "sorn/model/Schema.h"

namespace sorntest {

namespace {

constexpr uint32_t everyTypeFirst = 5919;
constexpr uint32_t everyTypeLast = 5924;

unsigned SeedsWanted(unsigned nSeeds) {
    const char* given = getenv("SORN_PAIRS_SEEDS");
    return given != nullptr ? static_cast<unsigned>(strtoul(given, nullptr, 10)) : nSeeds;
}

void ForEachOf(uint32_t first, uint32_t last, unsigned nSeeds,
               const std::function<void(const Record&, uint32_t)>& check) {
    for (uint32_t id = first; id <= last; ++id) {
        const sorn::StructInfo* info = sorn::Schema::FindStruct(id);
        if (info == nullptr) continue;
        for (uint32_t i = 0; i < SeedsWanted(nSeeds); ++i) {
            const uint32_t seed = id * 1000 + i;
            SCOPED_TRACE(std::string(info->name) + ", seed " + std::to_string(seed));
            check(RandomModel(seed).Make(*info), seed);
            if (::testing::Test::HasFailure()) return;
        }
    }
}

}  // namespace

void ForEachRecord(unsigned nSeeds, const std::function<void(const Record&, uint32_t)>& check) {
    ForEachOf(1, everyTypeFirst - 1, nSeeds, check);
}

void ForEachRecordOfEveryType(unsigned nSeeds, const std::function<void(const Record&, uint32_t)>& check) {
    ForEachOf(everyTypeFirst, everyTypeLast, nSeeds, check);
}

::testing::AssertionResult Same(const std::string& actual, const std::string& expected) {
    if (actual == expected) return ::testing::AssertionSuccess();
    size_t at = 0;
    while (at < actual.size() && at < expected.size() && actual[at] == expected[at]) ++at;
    size_t from = at < 60 ? 0 : at - 60;
    return ::testing::AssertionFailure()
           << "differs at " << at << ": actual " << ::testing::PrintToString(actual.substr(from, 160))
           << ", expected " << ::testing::PrintToString(expected.substr(from, 160));
}

}  // namespace sorntest
