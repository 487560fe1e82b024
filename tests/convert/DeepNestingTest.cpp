// Nesting costs memory of the pool and none of the thread's stack: all on 256 KiB.

#include <string>

#include "convert/ConvertFixture.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/model/Schema.h"
#include "sornschema/Error.h"
#include "sornschema/EveryTypeCompanion.h"
#include "support/SmallStack.h"

namespace sorntest {

using namespace sorn;
using sornschema::Error;
using sornschema::EveryTypeCompanion;

// ThreadSanitizer maps its shadow of each piece of the pool apart, and the system allows a process 65,530
// mappings.
#ifdef __SANITIZE_THREAD__
constexpr unsigned nLevelsG = 100000;
#else
constexpr unsigned nLevelsG = 1000000;
#endif

class DeepNestingTest : public ConvertFixture {
 protected:
    /// Dictionaries of type "error", each the "cause" of the one around it, the innermost with `text` as
    /// code.
    ref<Dictionary> DeepErrors(unsigned nLevels, const char* innermostCode) {
        RoxString type("error");
        RoxString badArgument("badArgument");
        ref<Dictionary> inner;
        for (unsigned i = 0; i < nLevels; ++i) {
            ref<Dictionary> outer = Dictionary::New(&pool, type);
            outer->Add(RoxString("code"), i == 0 ? RoxString(innermostCode) : badArgument);
            outer->Add(RoxString("text"), badArgument);
            if (inner != nullptr) outer->Add(RoxString("cause"), inner);
            inner = outer;
        }
        return inner;
    }
    static unsigned Depth(SornObject* object) {
        unsigned n = 0;
        for (; object != nullptr; object = static_cast<Error*>(object)->cause.get()) ++n;
        return n;
    }
};

TEST_F(DeepNestingTest, DeepObjectsBothWays) {
    RunOnSmallStack([this] {
        ref<Dictionary> dictionary = DeepErrors(nLevelsG, "badArgument");
        ref<SornObject> object;
        RoxString error;
        ASSERT_TRUE(Context().DictionaryToSornObject(dictionary, 42, object, error)) << error.NByte();
        EXPECT_EQ(Depth(object.get()), nLevelsG);
        ref<Dictionary> back = object->ToDictionary(42);
        EXPECT_TRUE(back->Equals(dictionary));
        ref<SornObject> clone = object->Clone(object->structId);
        ASSERT_NE(clone, nullptr);
        EXPECT_TRUE(*clone == *object);
        SornObject* innermost = clone.get();
        while (static_cast<Error*>(innermost)->cause != nullptr)
            innermost = static_cast<Error*>(innermost)->cause.get();
        static_cast<Error*>(innermost)->code = 1;
        EXPECT_FALSE(*clone == *object);
    });
}

TEST_F(DeepNestingTest, WordsOfManyLevels) {
    RunOnSmallStack([this] {
        ref<Dictionary> dictionary = DeepErrors(nLevelsG, "no such code");
        size_t before = pool.GetUsedBytes();
        ref<SornObject> object;
        RoxString error;
        EXPECT_FALSE(Context().DictionaryToSornObject(dictionary, 0, object, error));
        EXPECT_EQ(pool.GetUsedBytes(), before);
        const std::string innermost =
            "bad enum item nameCannot convert value for the field.. Bad single field: code";
        const std::string level = ". Can't unmarshal inner Dictionary. Bad single field: cause";
        ASSERT_EQ(error.NByte(), innermost.size() + (nLevelsG - 1) * level.size());
        std::string_view words = error.View();
        EXPECT_EQ(words.substr(0, innermost.size()), innermost);
        words.remove_prefix(innermost.size());
        for (; !words.empty(); words.remove_prefix(level.size())) {
            if (words.substr(0, level.size()) != level) FAIL() << words.substr(0, 100);
        }
    });
}

TEST_F(DeepNestingTest, RepeatedFields) {
    static constexpr unsigned nLevels = 100000;
    RunOnSmallStack([this] {
        RoxString type("everyTypeCompanion");
        RoxString children("children");
        ref<Dictionary> inner = Dictionary::New(&pool, type);
        for (unsigned i = 1; i < nLevels; ++i) {
            ref<ArrayValue> array(new (&pool) ArrayValue);
            array->Add(inner);
            array->Add(Dictionary::New(&pool, type));
            inner = Dictionary::New(&pool, type);
            inner->Add(children, array);
        }
        ref<SornObject> object;
        RoxString error;
        ASSERT_TRUE(Context().DictionaryToSornObject(inner, 7, object, error));
        unsigned n = 0;
        for (const SornObject* o = object.get(); o != nullptr; ++n) {
            const RoxGenericArray& array = static_cast<const EveryTypeCompanion*>(o)->children;
            o = array.FEmpty() ? nullptr : static_cast<const SornObject*>(array.At(0));
        }
        EXPECT_EQ(n, nLevels);
        EXPECT_TRUE(object->ToDictionary(7)->Equals(inner));
        ref<SornObject> same;
        ASSERT_TRUE(Context().DictionaryToSornObject(inner, 7, same, error));
        EXPECT_TRUE(*same == *object);
    });
}

TEST_F(DeepNestingTest, SingleAndRepeatedValuesOfAnObjectThatIsThere) {
    static constexpr unsigned nLevels = 100000;
    RunOnSmallStack([this] {
        const StructInfo& info = Error::structInfoG;
        ref<DictValue> value(DeepErrors(nLevels, "badArgument"));
        ref<SornObject> object = Error::Factory(&pool);
        RoxString error;
        ASSERT_TRUE(Context().DictToSingleField(FindField(info, "cause"), value, object.get(), error, 0));
        EXPECT_EQ(Depth(object.get()), nLevels + 1);
        ref<Dictionary> out = Dictionary::New(&pool, RoxString());
        Context().SingleFieldToDict(RoxString("x"), FindField(info, "cause"), object.get(), out, 0);
        EXPECT_TRUE(out->Get(RoxString("x"))->Equals(value));
        ref<SornObject> companion = EveryTypeCompanion::Factory(&pool);
        const FieldInfo* children = FindField(EveryTypeCompanion::structInfoG, "children");
        ASSERT_TRUE(Context().DictToMultiField(children, value, companion.get(), error, 0));
        EXPECT_TRUE(SornObject::MultiFieldEquals(children, companion->MemberAt(*children),
                                                 companion->MemberAt(*children)));
    });
}

}  // namespace sorntest
