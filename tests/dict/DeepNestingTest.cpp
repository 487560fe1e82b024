#include "DictFixture.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/StringValue.h"
#include "support/SmallStack.h"

namespace {

using sorn::ArrayValue;
using sorn::Dict;
using sorn::Dictionary;
using sorn::DictValue;
using sorn::StringValue;

constexpr unsigned nLevels = 1'000'000;

/// Values nested as deep as no thread's stack would bear a recursion.
class DeepNestingTest : public DictFixture {
 protected:
    /// Arrays in arrays with a text in the innermost.
    ref<DictValue> DeepArray(const char* text) {
        ref<DictValue> value = StringValue::Make(text, &pool);
        for (unsigned i = 0; i < nLevels; ++i) {
            ref<ArrayValue> array(new (&pool) ArrayValue(&pool));
            array->Add(value);
            value = std::move(array);
        }
        return value;
    }
    /// Dictionaries and arrays by turns; each dictionary has a text besides, each third level two values
    /// under its name.
    ref<DictValue> DeepMixture(const char* text) {
        const RoxString name = Text("name");
        const RoxString other = Text("other");
        ref<DictValue> value = StringValue::Make(text, &pool);
        for (unsigned i = 0; i < nLevels; ++i) {
            if (i % 2 == 0) {
                ref<ArrayValue> array(new (&pool) ArrayValue(&pool));
                array->Add(value);
                value = std::move(array);
                continue;
            }
            ref<Dictionary> dictionary(new (&pool) Dictionary(&pool));
            if (i % 3 == 0) dictionary->Add(name, name);
            dictionary->Add(name, value);
            dictionary->Add(other, other);
            value = std::move(dictionary);
        }
        return value;
    }
    ref<Dict> DeepDict(const char* text) {
        const RoxString name = Text("name");
        ref<Dict> dict = sorn::MakeDict(&pool);
        dict->AddString(name, Text(text));
        for (unsigned i = 0; i < nLevels; ++i) {
            ref<Dict> outer = sorn::MakeDict(&pool);
            outer->AddDict(name, dict);
            dict = std::move(outer);
        }
        return dict;
    }
};

TEST_F(DeepNestingTest, Arrays) {
    RunOnSmallStack([this] {
        const ref<DictValue> a = DeepArray("same");
        EXPECT_TRUE(a->Equals(DeepArray("same")));
        EXPECT_FALSE(a->Equals(DeepArray("other")));
    });
}

TEST_F(DeepNestingTest, DictionariesAndArrays) {
    RunOnSmallStack([this] {
        const ref<DictValue> a = DeepMixture("same");
        EXPECT_TRUE(a->Equals(DeepMixture("same")));
        EXPECT_FALSE(a->Equals(DeepMixture("other")));
    });
}

TEST_F(DeepNestingTest, Dicts) {
    RunOnSmallStack([this] {
        const ref<Dict> a = DeepDict("same");
        EXPECT_TRUE(a->Equals(DeepDict("same")));
        EXPECT_FALSE(a->Equals(DeepDict("other")));
        EXPECT_TRUE(a->Equals(DeepDict("same").get()));
    });
}

}  // namespace
