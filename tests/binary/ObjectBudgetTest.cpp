// What a reading may spend on objects. Invariant for untrusted input: 11.

#include "sorn/convert/ObjectBudget.h"

#include "binary/ValueRows.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryTypeCompanion;

class ObjectBudgetTest : public BinaryFixture {};

TEST_F(ObjectBudgetTest, SizesAreNotBelowWhatObjectsTake) {
    for (int round = 0; round < 2; ++round) {  // worked out, and remembered
        for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
            const StructInfo* const info = Schema::FindStruct(id);
            if (info == nullptr) continue;
            const size_t nBefore = pool.GetUsedBytes();
            const ref<SornObject> object = info->Factory(&pool);
            const size_t nObject = pool.GetUsedBytes() - nBefore;
            const uint32_t nEstimate = ObjectBudget::SizeOf(*info);
            // Pools round up by at most a fifth, and by a redzone under AddressSanitizer.
            EXPECT_GE(nEstimate * 5 / 4 + 64, nObject) << info->name;
            EXPECT_LE(nEstimate, nObject + sizeof(RoxGenericIntArray)) << info->name;
        }
    }
}

TEST_F(ObjectBudgetTest, FreeBytesAndInput) {
    const StructInfo& info = EveryTypeCompanion::structInfoG;
    const uint64_t nSize = ObjectBudget::SizeOf(info);
    for (const uint64_t nInput : {uint64_t{0}, uint64_t{1}, uint64_t{1000}, uint64_t{5} << 20}) {
        ObjectBudget budget(nInput);
        uint64_t nTaken = 0;
        while (budget.Take(info)) ++nTaken;
        EXPECT_EQ(nTaken, (33554432 + nInput * 48) / nSize);
        budget.AddInput(nSize);  // 48 times that, and the one that was too much
        for (nTaken = 0; budget.Take(info);) ++nTaken;
        EXPECT_GE(nTaken, 47u);
        EXPECT_LE(nTaken, 48u);
    }
    ObjectBudget budget(1);
    EXPECT_TRUE(budget.TakeBytes(33554432 + 48));
    EXPECT_FALSE(budget.TakeBytes(1));
}

/// Two bytes each for objects of two thousand: long lists of them are refused.
TEST_F(ObjectBudgetTest, ManyEmptyObjects) {
    const StructInfo* const recording = Schema::FindStruct(463);
    const uint64_t nSize = ObjectBudget::SizeOf(*recording);
    // A struct with one list of recordings, in slot 14, where everyType has a list of companions.
    const OneFieldStruct list("multiObject");
    FieldInfo fields[15];
    std::copy(list.Info().vFieldInfo, list.Info().vFieldInfo + 15, fields);
    fields[14].typeRef = 463;
    StructInfo info = list.Info();
    info.nFields = 15;
    info.vFieldInfo = fields;
    const auto isTaken = [&](unsigned n, const std::string& element) {
        std::string bytes;
        for (unsigned i = 0; i < n; ++i) bytes += list.Tag(2) + element;
        const ExactBytes exact(bytes);
        const unsigned char* cursor = exact.Begin();
        const ref<SornObject> object = sornschema::EveryType::Factory(&pool);
        return Codec().UnmarshalFields(&info, &cursor, exact.End(), object.get());
    };
    const auto nMost = static_cast<unsigned>(33554432 / (nSize - 2 * 48));
    EXPECT_TRUE(isTaken(nMost, Bytes("00")));
    EXPECT_FALSE(isTaken(nMost + 1, Bytes("00")));
    // Small objects never come near it.
    std::string small;
    const OneFieldStruct companions("multiObject");
    for (unsigned i = 0; i < 65535; ++i) small += companions.Tag(2) + Bytes("00");
    const ExactBytes exact(small);
    const unsigned char* cursor = exact.Begin();
    const ref<SornObject> object = sornschema::EveryType::Factory(&pool);
    EXPECT_TRUE(Codec().UnmarshalFields(&companions.Info(), &cursor, exact.End(), object.get()));
}

/// Dictionaries count, too: an empty one takes two bytes.
TEST_F(ObjectBudgetTest, ManyEmptyDictionaries) {
    const size_t nBefore = pool.GetUsedBytes();
    std::string body;
    for (unsigned name = 0; name < 40; ++name) {
        std::string values;
        for (unsigned i = 0; i < 65000; ++i) values += Bytes("42 00");
        body += Bytes("22") + Section(Bytes("32") + Section(std::to_string(name)) + values);
    }
    const ExactBytes bytes(body);
    const unsigned char* cursor = bytes.Begin();
    ref<Dict> dict;
    Codec().UnmarshalAnyDict(&cursor, bytes.End(), &dict);
    // Taken or refused: it must not have cost more than 64 times the input and the free bytes.
    EXPECT_LT(pool.GetHighWaterUsedBytes() - nBefore, 64 * body.size() + ObjectBudget::freeBytesG);
}

}  // namespace sorntest
