// The typed writer's text of random objects of all structs is, read as a dictionary, what their dictionaries
// are. The pairs of forms say more of it, but not on targets where they are cut to the record of every type.

#include "convert/RandomRecord.h"
#include "sorn/model/Schema.h"
#include "typedjson/WriterFixture.h"

namespace sorntest {

using namespace sorn;

class RandomWriterTest : public WriterFixture {
 protected:
    /// The text once it is read and written as a dictionary: sorted.
    std::string Sorted(const std::string& text) { return ::sorntest::Text(Parse(text)->ToJson(false)); }
    /// Whether older forms of fields may be in the text; the typed writer leaves them out.
    static bool FOlderForms(const std::string& text) {
        for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
            const StructInfo* const info = Schema::vStructDefG[id];
            if (info == nullptr || text.find(std::string("\"") + info->name + '"') == std::string::npos)
                continue;
            for (int i = 0; i < info->nFields; ++i) {
                if (info->vFieldInfoHistory[i].nVariants != 0) return true;
            }
        }
        return false;
    }
};

TEST_F(RandomWriterTest, AllStructs) {
    RandomRecord records(&pool, 20240);
    unsigned nCompared = 0;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const info = Schema::vStructDefG[id];
        // Its lists of lazy bodies are repeated names in dictionaries.
        if (info == nullptr || std::string(info->name).starts_with("everyType")) continue;
        const ref<SornObject> object = records.Make(*info);
        if (Typed(object).find("everyType") != std::string::npos) continue;
        for (const int version : {0, 7, 11, 12, 21, 22, 25, 26, 42}) {
            const std::string typed = Typed(object, version);
            if (version != 0 && FOlderForms(typed)) continue;
            EXPECT_EQ(Sorted(typed), Sorted(Json(object, version))) << info->name << " at " << version;
            ++nCompared;
        }
    }
    EXPECT_GT(nCompared, 1300u);
}

}  // namespace sorntest
