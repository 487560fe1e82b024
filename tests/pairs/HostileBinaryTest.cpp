#include "pairs/HostileFixture.h"
#include "pairs/LibraryForms.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/binary/ProtoBufByteOutputStream.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

class HostileBinaryTest : public HostileFixture {
 protected:
    ProtoBuf Codec() { return ProtoBuf(&pool, Schema::vStructDefG, Schema::nStructDefG); }

    /// Reads a record from the heap and from a body, which must agree, and writes it in all forms. What it
    /// writes in the binary form reads as what writes the same.
    void ReadKnown(const std::string& input) {
        const ExactBytes bytes(input);
        ref<SornObject> object;
        const bool isRead = Codec().UnmarshalKnownDict(bytes.Data(), bytes.Length(), &object);
        ASSERT_EQ(object != nullptr, isRead);
        ++(isRead ? nReadM : nRefusedM);
        const ref<LazyDict> lazy = LazyDict::FromBytestring(
            &pool, rox::ByteBuffer::New(&pool, input.data(), static_cast<uint32_t>(input.size())), 0);
        if (lazy == nullptr || lazy->GetRep() != LazyDict::REP_PROTOBUF) return;
        RoxString error;
        const ref<SornObject> ofBody = lazy->ToSornObjectOrErrorString(error);
        ASSERT_EQ(ofBody != nullptr, isRead);
        ASSERT_EQ(Text(error), isRead ? "" : "Protobuf did not unmarshal to SornObject");
        const std::string text = Text(lazy->ToJson(false));
        ASSERT_FALSE(text.empty());
        if (!isRead) {
            ASSERT_TRUE(Same(text, TypedText(ErrorRecord("protobuf did not unmarshal"), 0)));
            return;
        }
        ASSERT_TRUE(Same(Show(RecordOfObject(*ofBody)), Show(RecordOfObject(*object))));
        ASSERT_FALSE(lazy->ToJson(true).FEmpty());
        const std::string written = BytesOf(Codec().MarshalKnownDict(object.get()));
        ASSERT_TRUE(Same(BytesOf(Codec().MarshalKnownDict(ofBody.get())), written));
        // A required channel or currency that was lost is written as a text that no reader takes.
        if (written.find("\x07invalid") != std::string::npos) return;
        const ExactBytes again(written);
        ref<SornObject> second;
        ASSERT_TRUE(Codec().UnmarshalKnownDict(again.Data(), again.Length(), &second));
        ASSERT_TRUE(Same(BytesOf(Codec().MarshalKnownDict(second.get())), written));
    }

    void ReadAnyDict(const std::string& input) {
        const ExactBytes bytes(input);
        const unsigned char* cursor = bytes.Data();
        ref<Dict> dict;
        const bool isRead = Codec().UnmarshalAnyDictWithLength(&cursor, bytes.Data() + bytes.Length(), &dict);
        ++(isRead ? nReadM : nRefusedM);
        ASSERT_LE(cursor, bytes.Data() + bytes.Length());
        if (!isRead) return;
        const std::string written = Written(dict);
        const ExactBytes again(written);
        cursor = again.Data();
        ref<Dict> second;
        ASSERT_TRUE(Codec().UnmarshalAnyDictWithLength(&cursor, again.Data() + again.Length(), &second));
        ASSERT_EQ(cursor, again.Data() + again.Length());
        ASSERT_TRUE(Same(Written(second), written));
        ASSERT_TRUE(*second == *dict);
    }

    std::string Written(const ref<Dict>& dict) {
        ProtoBufByteOutputStream stream;
        Codec().MarshalAnyDictWithLength(dict.get(), stream);
        const unsigned char* data = nullptr;
        unsigned length = 0;
        stream.Finish(data, length);
        return std::string(reinterpret_cast<const char*>(data), length);
    }

    Attack Known() {
        return [this](const std::string& input) { ReadKnown(input); };
    }
    Attack AnyDicts() {
        return [this](const std::string& input) { ReadAnyDict(input); };
    }

    /// The names with one value, a list, a dictionary and an empty one, in the form with a length.
    static std::string AnyDictBytes() {
        Tree tree;
        Tree list = Tree::Array();
        list.items = {Tree::Text("one"), Tree::Dict(), Tree::Text("")};
        Tree inner;
        inner.Add("deep", list);
        inner.Add("d", Tree::Text(std::string(130, 'd')));
        tree.Add("text", Tree::Text("value"));
        tree.Add("list", list);
        tree.Add("", inner);
        Record record(*Schema::FindStruct(5919));
        Value value;
        value.tree = std::make_shared<Tree>(tree);
        record.fields[{4, currentForm}] = {value};
        const std::string bytes = Binary(record, false);
        return bytes.substr(bytes.find('\x22') + 1);  // behind the tag of field 4
    }
};

TEST_F(HostileBinaryTest, RecordsCutOff) {
    for (const Record& record : Victims()) Read(ForEachTruncation, Binary(record, false), Known());
    EXPECT_EQ(nReadM, 0u);
    EXPECT_GT(nRefusedM, 500u);
}

TEST_F(HostileBinaryTest, RecordsWithAWrongBit) {
    for (const Record& record : Victims()) Read(ForEachBitFlip, Binary(record, false), Known());
    EXPECT_GT(nReadM, 1000u);
    EXPECT_GT(nRefusedM, 500u);
}

TEST_F(HostileBinaryTest, RecordsWithAWrongNumber) {
    for (const Record& record : Victims()) Read(ForEachWrongNumber, Binary(record, false), Known());
    EXPECT_GT(nReadM, 500u);
    EXPECT_GT(nRefusedM, 1000u);
}

TEST_F(HostileBinaryTest, AnyDicts) {
    const std::string bytes = AnyDictBytes();
    ReadAnyDict(bytes);
    ASSERT_EQ(nReadM, 1u);
    Read(ForEachTruncation, bytes, AnyDicts());
    EXPECT_EQ(nReadM, 1u);
    Read(ForEachBitFlip, bytes, AnyDicts());
    Read(ForEachWrongNumber, bytes, AnyDicts());
    EXPECT_GT(nReadM, 100u);
    EXPECT_GT(nRefusedM, 100u);
}

}  // namespace sorntest
