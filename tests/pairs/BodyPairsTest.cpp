// Every conversion of a body in each of its six forms, on both roads, against the second account of it.

#include "kelbaselib/InMemoryBytestream.h"
#include "pairs/BodyModel.h"
#include "pairs/LibraryForms.h"
#include "pairs/PairsFixture.h"
#include "rox/RoxFeatures.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

class BodyPairsTest : public PairsFixture {
 protected:
    void TearDown() override {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        PairsFixture::TearDown();
    }

    static std::vector<Body> BodiesOf(const Record& record, int version, bool isTypedRoad);
    void Check(const Body& body, bool isTypedRoad);
    void CheckTrees(const LazyDict& lazy, const Body& body);
    void CheckObjects(const LazyDict& lazy, const Body& body, bool isTypedRoad);
    void CheckTexts(const LazyDict& lazy, const Body& body, bool isTypedRoad);
    void CheckTypes(LazyDict& lazy, const Body& body);

    unsigned nGoodM = 0;
    unsigned nRefusedM = 0;
};

/// A record's body in every form; text in both of its orders, and the dictionary that text gives.
std::vector<Body> BodyPairsTest::BodiesOf(const Record& record, int version, bool isTypedRoad) {
    std::vector<Body> bodies;
    const Tree tree = TreeOfRecord(record, version);
    auto add = [&](Body::Rep rep, const std::string& bytes) {
        Body body;
        body.rep = rep;
        body.version = version;
        body.bytes = bytes;
        if (rep == Body::ofObject) body.record = std::make_shared<Record>(record);
        if (rep == Body::ofBinary) body.record = std::make_shared<Record>(AfterBinary(record, isTypedRoad));
        if (rep == Body::ofDict || rep == Body::ofDictionary) body.tree = std::make_shared<Tree>(tree);
        bodies.push_back(body);
    };
    add(Body::ofObject, "");
    add(Body::ofBinary, Binary(record, isTypedRoad));
    add(Body::ofDict, "");
    add(Body::ofDictionary, "");
    for (Body::Rep rep : {Body::ofJson, Body::ofStream}) {
        add(rep, TreeText(tree, false));
        add(rep, TreeText(tree, true));
        add(rep, TypedText(record, version));
    }
    return bodies;
}

void BodyPairsTest::CheckTrees(const LazyDict& lazy, const Body& body) {
    std::string words;
    const std::optional<Tree> tree = BodyTree(body, words);
    RoxString error;
    const ref<Dictionary> dictionary = lazy.ToDictionary(error);
    ASSERT_EQ(dictionary != nullptr, tree.has_value()) << Text(error) << words;
    const Tree dict = TreeOfDictionary(*lazy.ToDict()->GetDictionary());
    if (tree) {
        ASSERT_TRUE(Same(Show(TreeOfDictionary(*dictionary)), Show(*tree)));
        ASSERT_TRUE(Same(Show(dict), Show(*tree)));
    } else if (FKnown(words)) {
        // The words of a stream are not handed on by this conversion.
        ASSERT_EQ(Text(error), words);
        ASSERT_TRUE(Same(Show(dict), Show(ErrorTree(words))));
    } else {
        ASSERT_EQ(dict.Find("type")->text, "error");
        ASSERT_EQ(dict.Find("code")->text, "badArgument");
    }
    ++(tree ? nGoodM : nRefusedM);
}

void BodyPairsTest::CheckObjects(const LazyDict& lazy, const Body& body, bool isTypedRoad) {
    std::string words;
    const std::optional<Record> record = BodyRecord(body, isTypedRoad, words);
    RoxString error;
    const ref<SornObject> object = lazy.ToSornObjectOrErrorString(error);
    ASSERT_EQ(object != nullptr, record.has_value()) << Text(error) << words;
    ++(record ? nGoodM : nRefusedM);
    ref<SornObject> out;
    ASSERT_EQ(lazy.ToSornObject(out), record.has_value());
    ASSERT_EQ(out != nullptr, record.has_value());
    const Record always = RecordOfObject(*lazy.ToSornObjectOrError());
    if (record) {
        const std::string expected = Show(*record);
        ASSERT_TRUE(Same(Show(RecordOfObject(*object)), expected));
        ASSERT_TRUE(Same(Show(RecordOfObject(*out)), expected));
        ASSERT_TRUE(Same(Show(always), expected));
    } else if (FKnown(words)) {
        ASSERT_EQ(Text(error), words);
        ASSERT_TRUE(Same(Show(always), Show(ErrorRecord(words))));
    } else {
        ASSERT_STREQ(always.info->name, "error");
    }
    const std::string binary = BodyBinary(body, isTypedRoad);
    if (FKnown(binary)) {
        ASSERT_TRUE(Same(BytesOf(lazy.ToProtobuf()), binary));
    }
}

void BodyPairsTest::CheckTexts(const LazyDict& lazy, const Body& body, bool isTypedRoad) {
    for (bool pretty : {false, true}) {
        const std::string expected = BodyText(body, pretty, Destination::buffer);
        sorn::ByteBuffer out(&pool);
        out.AppendString("before ");
        lazy.ToJsonByteBuffer(out, pretty);
        ASSERT_TRUE(Same(Text(out.ToRoxString(&pool)), "before " + expected)) << pretty;
        ASSERT_TRUE(Same(Text(lazy.ToJson(pretty)), expected)) << pretty;
        ASSERT_TRUE(Same(BytesOf(lazy.ToJsonBytestring(pretty)), expected)) << pretty;
        kelbaselib::InMemoryBytestream sink(&pool);
        lazy.ToJsonBytesink(sink, pretty);
        const std::string written(reinterpret_cast<const char*>(sink.GetData()), sink.GetLength());
        ASSERT_TRUE(Same(
            written, BodyText(body, pretty, isTypedRoad ? Destination::sinkOfTypedRoad : Destination::sink)))
            << pretty;
    }
}

/// Behind all others, for it reads a stream for good.
void BodyPairsTest::CheckTypes(LazyDict& lazy, const Body& body) {
    std::string words;
    std::string name;
    bool hasName = true;
    if (body.rep == Body::ofObject || body.rep == Body::ofBinary) {
        name = body.record->info->name;
    } else {
        const std::optional<Tree> tree = BodyTree(body, words);
        hasName = tree.has_value();
        if (hasName) name = tree->Find("type")->text;
    }
    RoxString found;
    unsigned id = 0;
    ASSERT_EQ(lazy.GetTypeName(&found), hasName);
    ASSERT_EQ(lazy.GetType(&id), hasName);
    if (hasName) {
        ASSERT_EQ(Text(found), name);
        ASSERT_EQ(name, Schema::FindStruct(id)->name);
    }
    bool isRead = body.rep == Body::ofStream && hasName;
    ASSERT_EQ(static_cast<int>(lazy.GetRep()), static_cast<int>(isRead ? Body::ofDictionary : body.rep));
}

void BodyPairsTest::Check(const Body& body, bool isTypedRoad) {
    SCOPED_TRACE("rep " + std::to_string(body.rep) + (isTypedRoad ? ", typed road" : ", dictionary road"));
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, isTypedRoad);
    const ref<LazyDict> lazy = MakeLazy(&pool, body);
    const std::string before = Show(body);
    ASSERT_TRUE(Same(Show(BodyOfLazy(*lazy)), before));
    ASSERT_NO_FATAL_FAILURE(CheckTrees(*lazy, body));
    ASSERT_NO_FATAL_FAILURE(CheckObjects(*lazy, body, isTypedRoad));
    ASSERT_NO_FATAL_FAILURE(CheckTexts(*lazy, body, isTypedRoad));
    ASSERT_TRUE(Same(Show(BodyOfLazy(*lazy)), before)) << "a conversion changed the body";
    ASSERT_NO_FATAL_FAILURE(CheckTypes(*lazy, body));
}

// All structs: of a record each form meets some versions, and all forms meet all versions over the structs.
TEST_F(BodyPairsTest, EveryStruct) {
    ForEachRecord(1, [&](const Record& record, uint32_t seed) {
        for (unsigned i = 0; i < allVersions.size(); ++i) {
            SCOPED_TRACE("version " + std::to_string(allVersions[i]));
            const bool isTypedRoad = (seed / 1000 + i) % 2 != 0;
            const std::vector<Body> bodies = BodiesOf(record, allVersions[i], isTypedRoad);
            for (unsigned j = 0; j < bodies.size(); ++j) {
                if ((seed / 1000 + i + j) % 5 != 0) continue;
                ASSERT_NO_FATAL_FAILURE(Check(bodies[j], isTypedRoad));
            }
        }
    });
    EXPECT_GT(nGoodM, 5 * nRefusedM);
    EXPECT_GT(nRefusedM, 0u);
}

TEST_F(BodyPairsTest, EveryType) {
    ForEachRecordOfEveryType(3, [&](const Record& record, uint32_t) {
        for (int version : allVersions) {
            SCOPED_TRACE("version " + std::to_string(version));
            for (bool isTypedRoad : {false, true}) {
                for (const Body& body : BodiesOf(record, version, isTypedRoad)) {
                    ASSERT_NO_FATAL_FAILURE(Check(body, isTypedRoad));
                }
            }
        }
    });
    EXPECT_GT(nGoodM, 0u);
    EXPECT_GT(nRefusedM, 0u);
}

// Bodies are equal when their dictionaries' texts are.
TEST_F(BodyPairsTest, FormsOfOneRecordAreEqual) {
    ForEachRecordOfEveryType(3, [&](const Record& record, uint32_t) {
        std::string words;
        std::vector<ref<LazyDict>> bodies;
        std::vector<std::string> texts;
        for (const Body& body : BodiesOf(record, 42, false)) {
            const std::optional<Tree> tree = BodyTree(body, words);
            bodies.push_back(MakeLazy(&pool, body));
            texts.push_back(TreeText(tree ? *tree : ErrorTree(words), false));
            if (!tree && !FKnown(words)) return;
        }
        for (size_t i = 0; i < bodies.size(); ++i) {
            for (size_t j = 0; j < bodies.size(); ++j) {
                EXPECT_EQ(*bodies[i] == *bodies[j], texts[i] == texts[j]) << i << " and " << j;
            }
        }
    });
}

}  // namespace sorntest
