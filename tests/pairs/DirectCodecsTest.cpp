// The codecs as their callers call them, without a body around: every pair of object, binary and typed text.

#include "kelbaselib/InMemoryBytestream.h"
#include "pairs/BodyModel.h"
#include "pairs/Hostile.h"
#include "pairs/LibraryForms.h"
#include "pairs/PairsFixture.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace sorntest {

using namespace sorn;

class DirectCodecsTest : public PairsFixture {
 protected:
    void CheckBinary(const Record& record) {
        const ref<SornObject> object = MakeObject(&pool, record);
        const std::string expected = Binary(record, false);
        ProtoBuf codec(&pool, Schema::vStructDefG, Schema::nStructDefG);
        ASSERT_TRUE(Same(BytesOf(codec.MarshalKnownDict(object.get())), expected));
        const Record after = AfterBinary(record, false);
        const ExactBytes bytes(expected);
        ref<SornObject> back;
        ASSERT_TRUE(codec.UnmarshalKnownDict(bytes.Data(), bytes.Length(), &back));
        ASSERT_TRUE(Same(Show(RecordOfObject(*back)), Show(after)));
        ASSERT_TRUE(Same(BytesOf(codec.MarshalKnownDict(back.get())), Binary(after, false)));
        ref<SornObject> shared;
        const ref<rox::ByteBuffer> buffer =
            rox::ByteBuffer::New(&pool, expected.data(), static_cast<uint32_t>(expected.size()));
        ASSERT_TRUE(codec.UnmarshalKnownDict(buffer, &shared));
        ASSERT_TRUE(Same(Show(RecordOfObject(*shared)), Show(after)));
        const Tree tree = TreeOfDictionary(*codec.DictFromSornObject(object)->GetDictionary());
        ASSERT_TRUE(Same(Show(tree), Show(TreeOfRecord(record, 0))));
    }

    void CheckTyped(const Record& record, int version) {
        const ref<SornObject> object = MakeObject(&pool, record);
        JsonSornObject codec(&pool);
        const std::string expected = TypedText(record, version);
        ASSERT_TRUE(Same(Text(codec.SornObjectToJson(object.get(), version)), expected));
        sorn::ByteBuffer out(&pool);
        out.AppendString("before ");
        codec.SornObjectToJson(object.get(), version, out);
        ASSERT_TRUE(Same(Text(out.ToRoxString(&pool)), "before " + expected));
        for (const std::string& text : {expected, TreeText(TreeOfRecord(record, version), true)}) {
            ASSERT_NO_FATAL_FAILURE(CheckTypedReader(codec, text, version));
        }
    }

    void CheckTypedReader(JsonSornObject& codec, const std::string& text, int version) {
        std::string expectedWords;
        const std::optional<Record> expected = RecordOfTypedText(text, expectedWords);
        ++(expected ? nGoodM : nRefusedM);
        const ExactBytes bytes(text);
        ref<SornObject> back;
        RoxString words;
        ASSERT_EQ(codec.JsonToSornObject(bytes.Data(), bytes.Length(), version, &back, words),
                  expected.has_value())
            << Text(words);
        if (FKnown(expectedWords)) {
            ASSERT_EQ(Text(words), expectedWords);
        }
        ASSERT_EQ(back != nullptr, expected.has_value());
        kelbaselib::InMemoryBytestream stream(&pool);
        stream.Write(text.data(), static_cast<unsigned>(text.size()));
        ref<SornObject> streamed;
        RoxString streamedWords;
        unsigned bytesRead = 0;
        ASSERT_EQ(codec.JsonToSornObject(&stream, bytesRead, version, &streamed, streamedWords),
                  expected.has_value());
        ASSERT_EQ(Text(streamedWords), Text(words));
        if (!expected) return;
        ASSERT_EQ(bytesRead, text.size());
        ASSERT_TRUE(Same(Show(RecordOfObject(*back)), Show(*expected)));
        ASSERT_TRUE(Same(Show(RecordOfObject(*streamed)), Show(*expected)));
    }

    unsigned nGoodM = 0;
    unsigned nRefusedM = 0;
};

TEST_F(DirectCodecsTest, BinaryOfEveryStruct) {
    ForEachRecord(3, [&](const Record& record, uint32_t) { ASSERT_NO_FATAL_FAILURE(CheckBinary(record)); });
}

TEST_F(DirectCodecsTest, BinaryOfEveryType) {
    ForEachRecordOfEveryType(
        40, [&](const Record& record, uint32_t) { ASSERT_NO_FATAL_FAILURE(CheckBinary(record)); });
}

TEST_F(DirectCodecsTest, TypedTextOfEveryStruct) {
    ForEachRecord(1, [&](const Record& record, uint32_t) {
        for (int version : allVersions) {
            SCOPED_TRACE(version);
            ASSERT_NO_FATAL_FAILURE(CheckTyped(record, version));
        }
    });
    EXPECT_GT(nGoodM, 5 * nRefusedM);
    EXPECT_GT(nRefusedM, 0u);
}

TEST_F(DirectCodecsTest, TypedTextOfEveryType) {
    ForEachRecordOfEveryType(12, [&](const Record& record, uint32_t) {
        for (int version : allVersions) {
            SCOPED_TRACE(version);
            ASSERT_NO_FATAL_FAILURE(CheckTyped(record, version));
        }
    });
    EXPECT_GT(nGoodM, 0u);
    EXPECT_GT(nRefusedM, 0u);
}

}  // namespace sorntest
