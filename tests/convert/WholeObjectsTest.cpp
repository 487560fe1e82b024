// Comparison and cloning of whole objects with fields that refer to something: bytes, any-dicts, lazy bodies.

#include <string>

#include "convert/ConvertFixture.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeBytes.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/EveryTypeLazy.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeBytes;
using sornschema::EveryTypeCompanion;
using sornschema::EveryTypeLazy;

class WholeObjectsTest : public ConvertFixture {
 protected:
    template <class T>
    ref<T> New() {
        return ref<T>(static_cast<T*>(T::Factory(&pool).get()));
    }
    template <class T>
    ref<T> CloneOf(const ref<T>& object) {
        return ref<T>(static_cast<T*>(object->Clone(object->structId).get()));
    }
    ref<Dict> ADict(const char* text) {
        ref<Dict> dict = MakeDict(&pool);
        dict->AddString("a", text);
        return dict;
    }
    ref<LazyDict> Lazy(const char* json) { return LazyDict::FromJsonString(&pool, RoxString(json), 0); }
};

TEST_F(WholeObjectsTest, BytesThatAreSetMakeObjectsDiffer) {
    ref<EveryTypeBytes> a = New<EveryTypeBytes>();
    ref<EveryTypeBytes> b = New<EveryTypeBytes>();
    EXPECT_TRUE(*a == *b);
    EXPECT_TRUE(*a == *a);
    a->number = b->number = 5;
    a->number_isSet = b->number_isSet = 1;
    EXPECT_TRUE(*a == *b);
    a->bytes = rox::ByteBuffer::New(&pool, "x", 1);
    EXPECT_FALSE(*a == *a);
    EXPECT_FALSE(*a == *b);
    EXPECT_FALSE(*b == *a);
    b->bytes = a->bytes;
    EXPECT_FALSE(*a == *b);
    EXPECT_TRUE(*a != *b);
    a->bytes = b->bytes = nullptr;
    EXPECT_TRUE(*a == *b);
}

TEST_F(WholeObjectsTest, AnyDictsCount) {
    ref<EveryTypeCompanion> a = New<EveryTypeCompanion>();
    ref<EveryTypeCompanion> b = New<EveryTypeCompanion>();
    a->dict = ADict("x");
    EXPECT_FALSE(*a == *b);
    EXPECT_FALSE(*b == *a);
    b->dict = ADict("x");
    EXPECT_TRUE(*a == *b);
    b->dict = ADict("y");
    EXPECT_FALSE(*a == *b);
}

TEST_F(WholeObjectsTest, LazyBodiesCount) {
    ref<EveryTypeLazy> a = New<EveryTypeLazy>();
    ref<EveryTypeLazy> b = New<EveryTypeLazy>();
    EXPECT_TRUE(*a == *b);
    a->body = Lazy(R"({"a": "b"})");
    EXPECT_FALSE(*a == *b);
    EXPECT_FALSE(*b == *a);
    b->body = Lazy(R"({ "a" : "b" })");
    EXPECT_TRUE(*a == *b);
    a->bodies.Add(a->body.get());
    EXPECT_FALSE(*a == *b);
    b->bodies.Add(Lazy(R"({"a": "c"})").get());
    EXPECT_FALSE(*a == *b);
    b->bodies.RemoveAt(0);
    b->bodies.Add(b->body.get());
    EXPECT_TRUE(*a == *b);
}

TEST_F(WholeObjectsTest, ClonesShareAnyDictsAndLazyBodies) {
    ref<EveryTypeCompanion> companion = New<EveryTypeCompanion>();
    companion->dict = ADict("x");
    ref<EveryTypeCompanion> cloned = CloneOf(companion);
    ASSERT_NE(cloned, nullptr);
    EXPECT_NE(cloned->dict, companion->dict);  // a Dict of its own around the same dictionary
    EXPECT_EQ(cloned->dict->GetDictionary(), companion->dict->GetDictionary());
    companion->dict->AddString("later", "y");
    EXPECT_EQ(Text(cloned->dict->GetString("later", 0)), "y");

    ref<EveryTypeLazy> lazy = New<EveryTypeLazy>();
    lazy->body = Lazy("{}");
    ref<EveryTypeLazy> clonedLazy = CloneOf(lazy);
    ASSERT_NE(clonedLazy, nullptr);
    EXPECT_EQ(clonedLazy->body, lazy->body);
    EXPECT_TRUE(*clonedLazy == *lazy);
}

TEST_F(WholeObjectsTest, ClonesShareTheElementsOfRepeatedAnyDicts) {
    ref<EveryType> object = New<EveryType>();
    object->requiredEnum = 1;
    ref<Dict> one = ADict("x");
    ref<Dict> two = ADict("y");
    object->multiAnyDict.Add(one.get());
    object->multiAnyDict.Add(nullptr);
    object->multiAnyDict.Add(two.get());
    ref<EveryType> clone = CloneOf(object);
    ASSERT_NE(clone, nullptr);
    ASSERT_EQ(clone->multiAnyDict.GetCount(), 2u);
    EXPECT_EQ(static_cast<Dict*>(clone->multiAnyDict.At(0))->GetDictionary(), one->GetDictionary());
    EXPECT_EQ(static_cast<Dict*>(clone->multiAnyDict.At(1))->GetDictionary(), two->GetDictionary());
}

TEST_F(WholeObjectsTest, ClonesCopyBytes) {
    ref<EveryTypeBytes> object = New<EveryTypeBytes>();
    object->bytes = rox::ByteBuffer::New(&pool, "\0\xFF", 2);
    ref<EveryTypeBytes> clone = CloneOf(object);
    ASSERT_NE(clone, nullptr);
    EXPECT_NE(clone->bytes, object->bytes);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(clone->bytes->GetData()), clone->bytes->GetLength()),
              std::string("\0\xFF", 2));
}

TEST_F(WholeObjectsTest, OfARepeatedLazyFieldAloneTheFirstElementIsCloned) {
    ref<EveryTypeLazy> object = New<EveryTypeLazy>();
    ref<LazyDict> one = Lazy(R"({"n": 1})");
    ref<LazyDict> two = Lazy(R"({"n": 2})");
    object->bodies.Add(one.get());
    EXPECT_TRUE(*CloneOf(object) == *object);
    object->bodies.Add(two.get());
    ref<EveryTypeLazy> clone = CloneOf(object);
    ASSERT_NE(clone, nullptr);
    ASSERT_EQ(clone->bodies.GetCount(), 1u);
    EXPECT_EQ(clone->bodies.At(0), one.get());
    EXPECT_FALSE(*clone == *object);

    ref<EveryTypeLazy> beginsWithNull = New<EveryTypeLazy>();
    beginsWithNull->bodies.Add(nullptr);
    beginsWithNull->bodies.Add(two.get());
    beginsWithNull->bodies.Add(one.get());
    clone = CloneOf(beginsWithNull);
    ASSERT_NE(clone, nullptr);
    ASSERT_EQ(clone->bodies.GetCount(), 1u);
    EXPECT_EQ(clone->bodies.At(0), two.get());
}

}  // namespace sorntest
