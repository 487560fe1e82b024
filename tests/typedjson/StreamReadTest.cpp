// Streams: bytes read, sources released, values over the end of a block; lazy bodies; limits. Invariants for
// untrusted input: 6, 11, 13.

#include <utility>
#include <vector>

#include "sorn/convert/ObjectBudget.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeLazy.h"
#include "sornschema/Recording.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

class StreamReadTest : public ReaderFixture {
 protected:
    /// The bytes that a read takes from a source.
    unsigned BytesRead(const std::string& text, bool isGood = true) {
        PieceSource* const source = new PieceSource(text, 100000);
        unsigned bytesRead = 77;
        ref<SornObject> object;
        RoxString words;
        EXPECT_EQ(JsonSornObject(&pool).JsonToSornObject(source, bytesRead, 0, &object, words), isGood);
        source->Release();
        return bytesRead;
    }
    static std::string LazyText(const LazyDict& body) {
        EXPECT_EQ(body.GetRep(), LazyDict::REP_BYTESOURCE);
        EXPECT_EQ(body.GetVersion().Number(), 0);
        kelbaselib::Bytesource* source = body.GetStoredBytesource()->NewSource();
        std::string text = RestOf(*source);
        source->Release();
        return text;
    }
};

TEST_F(StreamReadTest, BytesReadAreWholeReads) {
    const std::string success = R"({"type":"success"})";
    EXPECT_EQ(BytesRead(success), success.size());
    EXPECT_EQ(BytesRead(success + std::string(100, ' ')), success.size() + 100);
    EXPECT_EQ(BytesRead(success + std::string(40000, ' ')), 16384u);
    EXPECT_EQ(BytesRead(std::string(16384, ' ') + success + "x"), 16384 + success.size() + 1);
    EXPECT_EQ(BytesRead(std::string(40000, ' '), false), 40000u);
    EXPECT_EQ(BytesRead("x" + std::string(40000, ' '), false), 16384u);
}

class NoSource final : public kelbaselib::Bytesource {
 public:
    unsigned Read(void*, unsigned) override {
        ADD_FAILURE() << "the source itself is not read";
        return 0;
    }
    Bytesource* NewSource() override {
        ++nAsked;
        return nullptr;
    }
    unsigned GetAvailable() const override { return 0; }
    void Release() override { ADD_FAILURE() << "the source itself is not released"; }

    int nAsked = 0;
};

TEST_F(StreamReadTest, ASourceThatMakesNone) {
    NoSource source;
    unsigned bytesRead = 77;
    ref<SornObject> object = sornschema::EveryType::Factory(&pool);
    RoxString words;
    EXPECT_FALSE(JsonSornObject(&pool).JsonToSornObject(&source, bytesRead, 0, &object, words));
    EXPECT_EQ(source.nAsked, 2);
    EXPECT_EQ(bytesRead, 0u);
    EXPECT_EQ(object, nullptr);
    EXPECT_EQ(words.View(), "JSON object does not start with '{'.");
}

TEST_F(StreamReadTest, NegativeLengthsAreNone) {
    ref<SornObject> object;
    RoxString words;
    EXPECT_FALSE(JsonSornObject(&pool).JsonToSornObject(nullptr, -1, 0, &object, words));
    EXPECT_FALSE(JsonSornObject(&pool).JsonToSornObject(nullptr, 0, 0, &object, words));
    EXPECT_EQ(words.View(), "JSON object does not start with '{'.");
}

TEST_F(StreamReadTest, OneContextReadsMany) {
    JsonSornObject context(&pool);
    for (const char* text : {R"({"type":"success","a":[{},{}]})", R"({"type":"everyTypePlain"})", "{", "{}",
                             R"({"known":{"type":"success"},"type":"everyTypeCompanion"})"}) {
        const ExactText exact(text);
        ref<SornObject> object;
        RoxString words;
        context.JsonToSornObject(exact.Bytes(), static_cast<int>(exact.Length()), 42, &object, words);
        EXPECT_EQ(ShowObject(object.get()), ModelRead(text, "").shown) << text;
    }
}

// A record with everything in it, shifted so that each of its bytes comes to be the first one of a block.
TEST_F(StreamReadTest, EveryByteAtTheStartOfABlock) {
    const std::string record =
        R"( { "unknown" : { "a" : [ 1 , "\n" , { } ] } , "requiredLazy" : { "x" : "y\"" , "z" : [ ] } ,)"
        R"( "multiString" : [ "a\\b" , bare , [ "\u0041" ] ] , "optionalAnyDict" : { "k" : [ "v" , "w" ] } ,)"
        R"( "multiKnownDict" : [ { "label" : "text" , "type" : "everyTypeCompanion" } , { } ] ,)"
        R"( "optionalFloat" : -1.5e3 , "optionalBytes" : "QUI=" , "type" : "everyType" } )";
    const ReadOutcome expected = ModelRead(record, "");
    ASSERT_TRUE(expected.isRead) << expected.words;
    for (size_t nBefore = 16384 - record.size() - 1; nBefore <= 16385; ++nBefore) {
        EXPECT_EQ(ReadStream(std::string(nBefore, '\n') + record, 100000), expected) << nBefore;
    }
}

TEST_F(StreamReadTest, LazyTextsComeBackByteForByte) {
    std::string value = "{ \"text\" :\t\"";
    value += std::string(40000, 'x') + "\\u00e9\\\"\" ,\r\n \"list\": [ 1,2 , {\"a\":{}} ]   }";
    for (size_t nBefore : {0u, 10u, 16300u, 16340u}) {
        const std::string text = std::string(nBefore, ' ') + R"({"body":  )" + value + R"(  , "bodies": [)" +
                                 value + ", {}," + value + R"(], "type": "everyTypeLazy"})";
        std::vector<ref<SornObject>> objects = {Object(text)};
        for (unsigned nPiece : {1000u, 16384u}) {
            PieceSource* const source = new PieceSource(text, nPiece);
            unsigned bytesRead = 0;
            RoxString words;
            ref<SornObject> object;
            EXPECT_TRUE(JsonSornObject(&pool).JsonToSornObject(source, bytesRead, 0, &object, words));
            source->Release();
            objects.push_back(object);
        }
        kelbaselib::InMemoryBytestream stream(&pool);
        stream.Write(text.data(), static_cast<unsigned>(text.size()));
        unsigned bytesRead = 0;
        RoxString words;
        ref<SornObject> shared;
        EXPECT_TRUE(JsonSornObject(&pool).JsonToSornObject(&stream, bytesRead, 0, &shared, words));
        objects.push_back(shared);
        for (const ref<SornObject>& object : objects) {
            const sornschema::EveryTypeLazy& lazy = static_cast<sornschema::EveryTypeLazy&>(*object);
            EXPECT_EQ(LazyText(*lazy.body), value);
            ASSERT_EQ(lazy.bodies.GetCount(), 3u);
            EXPECT_EQ(LazyText(static_cast<LazyDict&>(*lazy.bodies.At(0))), value);
            EXPECT_EQ(LazyText(static_cast<LazyDict&>(*lazy.bodies.At(1))), "{}");
            EXPECT_EQ(LazyText(static_cast<LazyDict&>(*lazy.bodies.At(2))), value);
        }
    }
}

TEST_F(StreamReadTest, AListTakes65535Elements) {
    const std::pair<const char*, const char*> fields[] = {
        {"multiS32", "1"},        {"multiString", "a"},
        {"multiKnownDict", "{}"}, {"multiKnownDict", R"({"type":"success"})"},
        {"multiObject", "{}"},    {"multiAnyDict", R"({"a":1})"},
        {"multiLazy", "{}"},      {"multiStringId", "\"vuka:etc.1\""}};
    for (const auto& [field, element] : fields) {
        std::string text = "{\"type\": \"everyType\", \"" + std::string(field) + "\": [";
        for (int i = 0; i < 65535; ++i) text += std::string(i == 0 ? "" : ",") + element;
        ref<SornObject> object;
        RoxString words;
        JsonSornObject context(&pool);
        const auto read = [&](const std::string& whole) {
            return context.JsonToSornObject(reinterpret_cast<const unsigned char*>(whole.data()),
                                            static_cast<int>(whole.size()), 0, &object, words);
        };
        EXPECT_TRUE(read(text + "]}")) << field << words.Utf8();
        EXPECT_FALSE(read(text + "," + element + "]}")) << field;
        EXPECT_EQ(words.View(),
                  "Too many elements in field failed to UnmarshalOneMultiValue in AVReadFieldValue"
                  " Failed to parse an array member. Failed to parse value for key " +
                      std::string(field));
    }
}

TEST_F(StreamReadTest, MoreThan65535Objects) {
    std::string text = "{\"ignored\": [";
    for (int i = 0; i < 70000; ++i) text += "{},";
    text += "1], \"type\": \"everyTypeCompanion\", \"known\": {\"type\": \"success\"}}";
    EXPECT_NE(Read(text).shown.find("known|success{};"), std::string::npos);
}

// A small object in text is a large one in memory: lists of them end where the budget does.
TEST_F(StreamReadTest, ObjectsAreBoundedByTheText) {
    const uint64_t size = ObjectBudget::SizeOf(sornschema::Recording::structInfoG);
    const uint64_t nBytesEach = strlen("{},");
    ASSERT_GT(size, ObjectBudget::bytesPerInputByteG * nBytesEach);
    const uint64_t nGood = ObjectBudget::freeBytesG / (size - ObjectBudget::bytesPerInputByteG * nBytesEach);
    ASSERT_LT(nGood, 65000u) << "the list must have room for more than the budget";
    const auto list = [](uint64_t n) {
        std::string text = "{\"type\": \"recordingList\", \"recording\": [";
        for (uint64_t i = 0; i < n; ++i) text += "{},";
        text.back() = ']';
        return text + "}";
    };
    // A few for the list itself and for the text around the elements.
    ref<SornObject> object = Object(list(nGood - 20));
    object = nullptr;
    const std::string bad = list(nGood + 20);
    RoxString words;
    EXPECT_FALSE(JsonSornObject(&pool).JsonToSornObject(reinterpret_cast<const unsigned char*>(bad.data()),
                                                        static_cast<int>(bad.size()), 0, &object, words));
    EXPECT_EQ(object, nullptr);
    EXPECT_EQ(words.View(),
              " failed to Unmarshal TYPE_OBJECT in Multi failed to UnmarshalOneMultiValue in"
              " AVReadFieldValue Failed to parse an array member. Failed to parse value for key"
              " recording");
}

}  // namespace sorntest
