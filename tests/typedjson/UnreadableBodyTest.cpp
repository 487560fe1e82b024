// Lazy bodies that cannot be read, wherever they stand, are left out of the text, which stays JSON. Invariant
// for untrusted input: 14.

#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/EveryTypeLazy.h"
#include "typedjson/ReaderFixture.h"
#include "typedjson/WriterFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;
using sornschema::EveryTypeLazy;

class UnreadableBodyTest : public WriterFixture {
 protected:
    ref<LazyDict> StreamOf(const std::string& text) {
        return LazyDict::FromBytesource(&pool, new PieceSource(text, 5), 0);
    }
    /// One of each kind; which one does not matter to those that hold it.
    std::vector<ref<LazyDict>> Bad() {
        return {StreamOf(notJsonM), StreamOf(cutOffM), StreamOf(nothingM),
                LazyDict::FromBytesource(&pool, nullptr, 0), LazyDict::FromSornObject(&pool, nullptr, 0)};
    }
    ref<LazyDict> Good() { return LazyDict::FromJsonString(&pool, RoxString(&pool, "{\"a\":1}"), 0); }
    /// The text of bodies, "g" for a good one and "b" for a bad one, in a list.
    std::string ListText(const std::string& order, const ref<LazyDict>& bad) {
        const ref<EveryTypeLazy> object = New<EveryTypeLazy>();
        for (const char each : order) object->bodies.Add(each == 'g' ? Good().get() : bad.get());
        return Typed(object);
    }
    static std::string WithBodies(const std::string& bodies) {
        return R"({"bodies": [)" + bodies + R"(], "type": "everyTypeLazy"})";
    }

    const std::string notJsonM = "not JSON";
    const std::string cutOffM = "{\"a\": 1, ";
    const std::string nothingM;
};

TEST_F(UnreadableBodyTest, SingleFields) {
    for (const ref<LazyDict>& bad : Bad()) {
        const ref<EveryTypeLazy> alone = New<EveryTypeLazy>();
        alone->body = bad;
        EXPECT_EQ(Typed(alone), R"({"type": "everyTypeLazy"})");
        EXPECT_EQ(Typed(alone, 42), R"({"type": "everyTypeLazy"})");
        const ref<EveryType> object = New<EveryType>();
        const std::string without = Typed(object);
        object->optionalLazy = bad;
        object->requiredLazy = bad;
        EXPECT_EQ(Typed(object), without);
        EXPECT_EQ(Typed(object), without) << "the second time";
        EXPECT_EQ(Single(*object, Field("optionalLazy")), "");
        EXPECT_EQ(Single(*object, Field("requiredLazy")), "");
    }
}

TEST_F(UnreadableBodyTest, TheNextFieldIsTheFirst) {
    for (const ref<LazyDict>& bad : Bad()) {
        const ref<EveryType> object = New<EveryType>();
        object->requiredLazy = bad;
        object->optionalS32 = 3;
        ByteBuffer out(&pool);
        bool isFirst = true;
        JsonSornObject writer(&pool);
        writer.SingleFieldToJson("a", &Field("requiredLazy"), object.get(), out, isFirst, 0);
        EXPECT_TRUE(isFirst);
        writer.SingleFieldToJson("b", &Field("optionalS32"), object.get(), out, isFirst, 0);
        writer.SingleFieldToJson("c", &Field("requiredLazy"), object.get(), out, isFirst, 0);
        writer.SingleFieldToJson("d", &Field("optionalS32"), object.get(), out, isFirst, 0);
        EXPECT_EQ(::sorntest::Text(out), R"("b": 3, "d": 3)");
        writer.LazyToJson(bad.get(), out);
        EXPECT_EQ(::sorntest::Text(out), R"("b": 3, "d": 3)");
    }
}

TEST_F(UnreadableBodyTest, Elements) {
    const std::string good = "{\"a\":1}";
    for (const ref<LazyDict>& bad : Bad()) {
        EXPECT_EQ(ListText("bgg", bad), WithBodies(good + "," + good));
        EXPECT_EQ(ListText("gbg", bad), WithBodies(good + "," + good));
        EXPECT_EQ(ListText("ggb", bad), WithBodies(good + "," + good));
        EXPECT_EQ(ListText("bgb", bad), WithBodies(good));
        EXPECT_EQ(ListText("b", bad), WithBodies(""));
        EXPECT_EQ(ListText("bbb", bad), WithBodies(""));
        const ref<EveryType> object = New<EveryType>();
        object->multiLazy.Add(bad.get());
        EXPECT_EQ(Multi(*object, Field("multiLazy")), R"("k": [])");
    }
}

TEST_F(UnreadableBodyTest, InsideEachOther) {
    for (const ref<LazyDict>& bad : Bad()) {
        const ref<EveryTypeLazy> inner = New<EveryTypeLazy>();
        inner->body = bad;
        inner->bodies.Add(bad.get());
        inner->bodies.Add(Good().get());
        const std::string innerText = R"({"bodies": [{"a":1}], "type": "everyTypeLazy"})";
        const ref<EveryTypeLazy> outer = New<EveryTypeLazy>();
        outer->bodies.Add(bad.get());
        outer->bodies.Add(LazyDict::FromSornObject(&pool, inner, 0).get());
        outer->body = LazyDict::FromSornObject(&pool, inner, 0);
        EXPECT_EQ(Typed(outer), R"({"bodies": [)" + innerText + R"(], "type": "everyTypeLazy", "body": )" +
                                    innerText + "}");
        const ref<EveryTypeCompanion> companion = New<EveryTypeCompanion>();
        const ref<EveryTypeCompanion> child = New<EveryTypeCompanion>();
        child->known = inner;
        companion->child = child;
        const ref<Dictionary> dictionary(new (&pool) Dictionary(&pool));
        dictionary->Add(RoxString("bad"), bad);
        dictionary->Add(RoxString("good"), LazyDict::FromSornObject(&pool, outer, 0));
        companion->dict = new (&pool) Dict(dictionary);
        EXPECT_EQ(Typed(companion), R"({"child": {"known": )" + innerText +
                                        R"(, "type": "everyTypeCompanion"}, "dict": {"good": )" +
                                        Typed(outer) + R"(}, "type": "everyTypeCompanion"})");
    }
}

// A typed reader makes streams of lazy fields, whose text only its syntax was tested of: what the stream
// parser refuses does not come back.
TEST_F(UnreadableBodyTest, WhatTheTypedReaderTook) {
    const std::string text =
        R"({"type": "everyTypeLazy", "bodies": [{a:1}, {"b": 2}, {"c" :3,}], "body": {bare: 1}})";
    ref<SornObject> object;
    RoxString words;
    ASSERT_TRUE(JsonSornObject(&pool).JsonToSornObject(reinterpret_cast<const unsigned char*>(text.data()),
                                                       static_cast<int>(text.size()), 0, &object, words));
    EXPECT_EQ(Typed(object), R"({"bodies": [{"b": 2}], "type": "everyTypeLazy"})");
}

}  // namespace sorntest
