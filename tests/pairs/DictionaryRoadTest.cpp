// Objects, dictionaries and text by the parser for text in memory, against the second account of them.

#include "pairs/BodyModel.h"
#include "pairs/LibraryForms.h"
#include "pairs/PairsFixture.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

class DictionaryRoadTest : public PairsFixture {
 protected:
    DictionarySornObject Context() {
        return DictionarySornObject(&pool, Schema::vStructDefG, Schema::nStructDefG);
    }

    void ExpectRecord(const ref<Dictionary>& dictionary, const Tree& tree, int version) {
        std::string words;
        const std::optional<Record> expected = RecordOfTree(tree, version, words);
        ref<SornObject> object;
        RoxString error;
        ASSERT_EQ(Context().DictionaryToSornObject(dictionary, version, object, error), expected.has_value())
            << Text(error) << words;
        ASSERT_EQ(Text(error), words);
        ++(expected ? nGoodM : nRefusedM);
        if (expected) {
            ASSERT_TRUE(Same(Show(RecordOfObject(*object)), Show(*expected)));
        }
    }

    void Check(const Record& record, int version) {
        const ref<SornObject> object = MakeObject(&pool, record);
        ASSERT_TRUE(Same(Show(RecordOfObject(*object)), Show(record)));
        const Tree tree = TreeOfRecord(record, version);
        const ref<Dictionary> dictionary = Context().SornObjectToDictionary(object.get(), version);
        ASSERT_TRUE(Same(Show(TreeOfDictionary(*dictionary)), Show(tree)));
        for (bool pretty : {false, true})
            ASSERT_TRUE(Same(Text(dictionary->ToJson(pretty)), TreeText(tree, pretty)));
        ASSERT_NO_FATAL_FAILURE(ExpectRecord(dictionary, tree, version));

        const std::string text = TreeText(tree, (version & 1) != 0);
        std::string words;
        const std::optional<Tree> expected = ParseText(text, Dialect::hand, words);
        RoxString error;
        const ref<Dictionary> parsed =
            Dictionary::FromJson(reinterpret_cast<const unsigned char*>(text.data()),
                                 static_cast<unsigned>(text.size()), error, &pool);
        ASSERT_EQ(Text(error), words);
        ASSERT_EQ(parsed != nullptr, expected.has_value());
        ++(expected ? nGoodM : nRefusedM);
        if (!expected) return;
        ASSERT_TRUE(Same(Show(TreeOfDictionary(*parsed)), Show(*expected)));
        ASSERT_NO_FATAL_FAILURE(ExpectRecord(parsed, *expected, version));
    }

    unsigned nGoodM = 0;
    unsigned nRefusedM = 0;
};

TEST_F(DictionaryRoadTest, EveryStructAtEveryVersion) {
    ForEachRecord(1, [&](const Record& record, uint32_t) {
        for (int version : allVersions) {
            SCOPED_TRACE(version);
            ASSERT_NO_FATAL_FAILURE(Check(record, version));
        }
    });
    EXPECT_GT(nGoodM, 20 * nRefusedM);
    EXPECT_GT(nRefusedM, 0u);
}

TEST_F(DictionaryRoadTest, EveryTypeAtEveryVersion) {
    ForEachRecordOfEveryType(12, [&](const Record& record, uint32_t) {
        for (int version : allVersions) {
            SCOPED_TRACE(version);
            ASSERT_NO_FATAL_FAILURE(Check(record, version));
        }
    });
    EXPECT_GT(nGoodM, 0u);
    EXPECT_GT(nRefusedM, 0u);
}

}  // namespace sorntest
