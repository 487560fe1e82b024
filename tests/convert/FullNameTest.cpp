// A name of a dictionary takes 65,535 values. A field that comes after them must leave everything as it is.

#include <string>

#include "convert/ConvertFixture.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

constexpr unsigned nMostValues = 65535;

class FullNameTest : public ConvertFixture {
 protected:
    /// An object with two elements in the repeated fields, and with objects inside objects.
    ref<EveryType> Filled() {
        ref<EveryType> object(static_cast<EveryType*>(EveryType::Factory(&pool).get()));
        ref<EveryTypeCompanion> inner = ObjectOf<EveryTypeCompanion>(
            R"({"type": "everyTypeCompanion", "number": 5, "child": {"type": "everyTypeCompanion", "label": "x"}})");
        ref<LazyDict> lazy = LazyDict::FromJsonString(&pool, RoxString("{}"), 0);
        object->requiredObject = inner;
        object->requiredKnownDict = inner;
        object->requiredString = RoxString("text");
        object->requiredBytes = rox::ByteBuffer::New(&pool, "Man", 3);
        object->requiredAnyDict = MakeDict(&pool);
        object->requiredLazy = lazy;
        for (int32_t i : {1, 2}) {
            object->multiS32.Add(&i);
            object->multiString.Add(RoxString("text"));
            object->multiObject.Add(inner.get());
            object->multiAnyDict.Add(object->requiredAnyDict.get());
            object->multiLazy.Add(lazy.get());
        }
        return object;
    }
    ref<Dictionary> WithValues(unsigned nValues) {
        ref<Dictionary> out = Dictionary::New(&pool, RoxString());
        for (unsigned i = 0; i < nValues; ++i) EXPECT_TRUE(out->Add(nameM, RoxString("value")));
        return out;
    }
    void AddField(const char* name, const SornObject& object, ref<Dictionary>& out) {
        const FieldInfo* field = FindField(EveryType::structInfoG, name);
        if (field->arity == SORN_ARITY_MULTI) {
            Context().MultiFieldToDict(nameM, field, &object, out, 0);
        } else {
            Context().SingleFieldToDict(nameM, field, &object, out, 0);
        }
    }

    const RoxString nameM{"x"};
};

TEST_F(FullNameTest, AFieldWhoseNameIsFullLeavesTheDictionaryAsItIs) {
    ref<EveryType> object = Filled();
    ref<Dictionary> out = WithValues(nMostValues);
    const std::string before = Text(out->ToJson(false));
    const size_t nBytes = pool.GetUsedBytes();
    for (const char* name : {"requiredS32", "requiredString", "requiredBytes", "requiredAnyDict",
                             "requiredLazy", "requiredObject", "requiredKnownDict", "multiS32", "multiString",
                             "multiObject", "multiAnyDict", "multiLazy"}) {
        SCOPED_TRACE(name);
        AddField(name, *object, out);
        EXPECT_EQ(out->CountValues(nameM), nMostValues);
        EXPECT_EQ(pool.GetUsedBytes(), nBytes);
    }
    EXPECT_EQ(Text(out->ToJson(false)), before);
}

TEST_F(FullNameTest, TheLastFreeValueIsTaken) {
    struct Row {
        const char* field;
        const char* last;
    };
    const Row vRow[] = {
        {"requiredS32", "0"},
        {"multiS32", "[1, 2]"},
        {"multiLazy", "{}"},  // the second element finds the name full
        {"requiredObject",
         R"({"child": {"label": "x", "type": "everyTypeCompanion"}, "number": 5, "type": "everyTypeCompanion"})"},
    };
    ref<EveryType> object = Filled();
    for (const Row& row : vRow) {
        SCOPED_TRACE(row.field);
        ref<Dictionary> out = WithValues(nMostValues - 1);
        AddField(row.field, *object, out);
        EXPECT_EQ(out->CountValues(nameM), nMostValues);
        RoxArray<DictValue> values(&pool);
        out->GetRange(nameM, values);
        EXPECT_EQ(Text(values.At(nMostValues - 1)->ToJson(false)), row.last);
        EXPECT_EQ(Text(values.At(nMostValues - 2)->ToJson(false)), R"("value")");
    }
}

TEST_F(FullNameTest, ANameThatHasAValueGetsOneMore) {
    struct Row {
        const char* field;
        const char* json;
    };
    const Row vRow[] = {
        {"requiredS32", R"({"x": "value", "x": 0})"},
        {"multiS32", R"({"x": "value", "x": [1, 2]})"},
        {"multiLazy", R"({"x": "value", "x": {}, "x": {}})"},
        {"multiAnyDict", R"({"x": "value", "x": [{}, {}]})"},
        {"requiredObject",
         R"({"x": "value", "x": {"child": {"label": "x", "type": "everyTypeCompanion"}, "number": 5, )"
         R"("type": "everyTypeCompanion"}})"},
    };
    ref<EveryType> object = Filled();
    for (const Row& row : vRow) {
        SCOPED_TRACE(row.field);
        ref<Dictionary> out = WithValues(1);
        AddField(row.field, *object, out);
        EXPECT_EQ(Text(out->ToJson(false)), row.json);
    }
}

}  // namespace sorntest
