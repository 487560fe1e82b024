// Fields by name, over the whole schema.

#include <thread>
#include <vector>

#include "sorn/model/Schema.h"
#include "sorn/typedjson/FieldIndex.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

class IndexReadTest : public ReaderFixture {
 protected:
    /// Checks all names of a struct, and some that are almost one; gives how many fields there are.
    static unsigned CheckAll(const StructInfo& info) {
        const FieldIndex* const index = FieldIndex::Of(info);
        if (index == nullptr) {
            ADD_FAILURE() << info.name;
            return 0;
        }
        unsigned n = 0;
        for (int slot = 0; slot < info.nFields; ++slot) {
            const FieldInfo* const field = &info.vFieldInfo[slot];
            if (field->FHole()) continue;
            const std::string name = info.FieldName(*field);
            EXPECT_EQ(index->Find(NameKey(name)), field) << info.name << "." << name;
            EXPECT_EQ(FieldIndex::FindByWalk(info, name), field);
            for (const std::string& other : {name + "x", name.substr(0, name.size() - 1) + "#", "x" + name}) {
                EXPECT_EQ(index->Find(NameKey(other)), FieldIndex::FindByWalk(info, other)) << other;
            }
            ++n;
        }
        EXPECT_EQ(index->Find(NameKey("")), nullptr);
        EXPECT_EQ(FieldIndex::FindByWalk(info, ""), nullptr);
        return n;
    }
    static unsigned CheckAll() {
        unsigned n = 0;
        for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
            const StructInfo* const info = Schema::FindStruct(id);
            if (info != nullptr) n += CheckAll(*info);
        }
        return n;
    }
};

TEST_F(IndexReadTest, EveryFieldOfTheSchema) {
    const unsigned n = CheckAll();
    EXPECT_GT(n, 2000u);
    FieldIndex::DestroyAll();
    EXPECT_EQ(CheckAll(), n);
}

TEST_F(IndexReadTest, StructsOfOthersHaveNone) {
    StructInfo info = *Schema::FindStruct(5919);
    EXPECT_EQ(FieldIndex::Of(info), nullptr);
    EXPECT_STREQ(info.FieldName(*FieldIndex::FindByWalk(info, "label")), "label");
    info.name = "noSuchStruct";
    EXPECT_EQ(FieldIndex::Of(info), nullptr);
}

TEST_F(IndexReadTest, ThreadsShareTheIndexes) {
    FieldIndex::DestroyAll();
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) threads.emplace_back([] { CheckAll(); });
    for (std::thread& thread : threads) thread.join();
}

}  // namespace sorntest
