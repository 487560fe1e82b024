// Streams in memory are read where they lie: bytes read as if in blocks, and lazy bodies that share the
// bytes.

#include <utility>
#include <vector>

#include "kelbaselib/InMemoryBytesource.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeLazy.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;
using kelbaselib::InMemoryBytesource;
using kelbaselib::InMemoryBytestream;
using sornschema::EveryTypeLazy;

class MemorySourceReadTest : public ReaderFixture {
 protected:
    /// Reads a source of EveryTypeLazy; null when it is refused.
    ref<EveryTypeLazy> ReadLazy(kelbaselib::Bytesource* source) { return ReadLazy(source, &pool); }
    static ref<EveryTypeLazy> ReadLazy(kelbaselib::Bytesource* source, RoxMempool* readPool) {
        ref<SornObject> object;
        unsigned bytesRead = 0;
        RoxString words;
        EXPECT_TRUE(JsonSornObject(readPool).JsonToSornObject(source, bytesRead, 0, &object, words))
            << std::string(words.View()).substr(0, 300);
        return ref<EveryTypeLazy>(static_cast<EveryTypeLazy*>(object.get()));
    }
    static std::string TextOf(const LazyDict& body) {
        kelbaselib::Bytesource* const source = body.GetStoredBytesource()->NewSource();
        const std::string text = RestOf(*source);
        source->Release();
        return text;
    }
    /// The storage that a body shares with its text; null for a copy.
    static const void* SharedStorage(const LazyDict& body) {
        const auto* source = dynamic_cast<const InMemoryBytesource*>(body.GetStoredBytesource());
        return source != nullptr ? &source->GetStorage() : nullptr;
    }
    static const void* StorageOf(InMemoryBytestream& stream) {
        kelbaselib::Bytesource* const source = stream.NewSource();
        const void* const storage = &dynamic_cast<InMemoryBytesource&>(*source).GetStorage();
        source->Release();
        return storage;
    }
    static void Write(InMemoryBytestream& stream, const std::string& text) {
        stream.Write(text.data(), static_cast<unsigned>(text.size()));
    }
};

struct BytesReadCase {
    size_t nBlanks;     ///< in front of
    const char* begin;  ///< which is followed by
    size_t nBehind;     ///< so many blanks
    unsigned bytesRead;
};

// The first three of each kind let the decisive byte be the last one of a block, the first one of the next
// one, and the one behind that.
const BytesReadCase vBytesReadG[] = {
    // The closing brace is the last byte that is looked at.
    {16366, R"({"type":"success"})", 50000, 16384},
    {16367, R"({"type":"success"})", 50000, 32768},
    {16368, R"({"type":"success"})", 50000, 32768},
    {16366, R"({"type":"success"})", 0, 16384},
    {16367, R"({"type":"success"})", 7, 16392},
    // A byte that is not what must stand there is looked at.
    {16380, R"({"a"x)", 50000, 32768},
    {16379, R"({"a"x)", 50000, 16384},
    {16378, R"({"a"x)", 50000, 16384},
    // A letter behind a backslash is looked at and passed, right or wrong.
    {16379, R"({"a\q)", 50000, 16384},
    {16380, R"({"a\q)", 50000, 32768},
    {16381, R"({"a\q)", 50000, 32768},
    // The end.
    {16383, "{", 0, 16384},
    {16384, "{", 0, 16385},
    {16383, "{", 50000, 66384},
    {32767, "x", 50000, 32768},
    {32768, "x", 50000, 49152},
};

TEST_F(MemorySourceReadTest, BytesReadAreThoseOfBlocks) {
    for (const BytesReadCase& each : vBytesReadG) {
        const std::string text = std::string(each.nBlanks, ' ') + each.begin + std::string(each.nBehind, ' ');
        EXPECT_EQ(BytesReadInBlocks(text), each.bytesRead) << each.nBlanks << each.begin;
        ReadInMemory(text);  // tests that it is the same
    }
}

// Failures of all kinds at each place around the end of a block.
TEST_F(MemorySourceReadTest, FailuresAroundTheEndOfABlock) {
    const std::string texts[] = {
        "",
        "x",
        "{",
        "{,",
        R"({"a)",
        R"({"a")",
        R"({"a"})",
        R"({"a":)",
        R"({"a":"\q"})",
        R"({"a":"\)",
        std::string("{\"a\":\"\0\"}", 9),
        R"({"a":"x")",
        R"({"a":"x";)",
        R"({"a":[)",
        R"({"a":[1)",
        R"({"a":[1,)",
        R"({"a":[1}})",
        R"({"a":{"b":1])",
        R"({"type":"\x"})",
        R"({"type":"success"])",
        R"({"type":"none"})",
        R"({"type":"everyTypePlain","requiredS32":x})",
        R"({"type":"everyTypeLazy","body":{"a":1]})",
    };
    for (const std::string& text : texts) {
        for (size_t nBefore = 16384 - text.size() - 1; nBefore <= 16385; ++nBefore) {
            for (const size_t nBehind : {0u, 1u, 20000u}) {
                const std::string whole = std::string(nBefore, ' ') + text + std::string(nBehind, '\t');
                EXPECT_EQ(ReadInMemory(whole, "before"), Read(whole, "before")) << nBefore << text;
            }
        }
    }
}

TEST_F(MemorySourceReadTest, ASourceIsReadFromWhereItStands) {
    InMemoryBytestream stream;
    Write(stream, R"(skipped{"type":"success"})");
    kelbaselib::Bytesource* const source = stream.NewSource();
    char skipped[7];
    source->Read(skipped, 7);
    InputPointerBytesource cursor = InputPointerBytesource::Over(source);
    EXPECT_EQ(cursor.TakenBytes(), 0u);
    EXPECT_TRUE(cursor.FSkipTo('{'));
    RoxString words;
    EXPECT_TRUE(JsonSornObject(&pool).Unmarshal(0, cursor, nullptr, nullptr, words));
    EXPECT_EQ(cursor.TakenBytes(), 18u);
    EXPECT_EQ(source->GetAvailable(), 18u);
    source->Release();
}

TEST_F(MemorySourceReadTest, LargeBodiesShareTheBytes) {
    const std::string large = "{ \"a\": \"" + std::string(500, 'x') + "\" }";
    const std::string small = "{\"a\":\t\"y\"}";
    ref<EveryTypeLazy> object;
    {
        InMemoryBytestream stream(&pool);
        Write(stream, R"({"type":"everyTypeLazy","body": )" + large + R"( ,"bodies":[)" + small + " , " +
                          large + "]}");
        object = ReadLazy(&stream);
        ASSERT_EQ(object->bodies.GetCount(), 2u);
        EXPECT_EQ(SharedStorage(*object->body), StorageOf(stream));
        EXPECT_EQ(SharedStorage(static_cast<LazyDict&>(*object->bodies.At(0))), nullptr);
        EXPECT_EQ(SharedStorage(static_cast<LazyDict&>(*object->bodies.At(1))), StorageOf(stream));
        Write(stream, std::string(5000, 'z'));  // moves the bytes
    }
    EXPECT_EQ(TextOf(*object->body), large);
    EXPECT_EQ(TextOf(static_cast<LazyDict&>(*object->bodies.At(0))), small);
    EXPECT_EQ(TextOf(static_cast<LazyDict&>(*object->bodies.At(1))), large);
}

TEST_F(MemorySourceReadTest, ABodyOutlivesThePoolOfItsText) {
    const std::string body = "{ \"a\": \"" + std::string(500, 'x') + "\" }";
    ref<EveryTypeLazy> object;
    {
        RoxMempool other("other");
        InMemoryBytestream stream(&other);
        Write(stream, R"({"type":"everyTypeLazy","body":)" + body + "}");
        object = ReadLazy(&stream);
    }
    EXPECT_EQ(SharedStorage(*object->body), nullptr);
    EXPECT_EQ(TextOf(*object->body), body);
}

// Each level holds nearly all of the text: it must be there once, not once for each level.
TEST_F(MemorySourceReadTest, BodiesInBodiesTakeTheTextOnce) {
    constexpr unsigned nLevels = 1000;
    const std::string core = "{\"a\":\"" + std::string(4u << 20, 'x') + "\"}";
    std::string text;
    for (unsigned i = 0; i < nLevels; ++i) text += R"({"type":"everyTypeLazy","body":)";
    text += core + std::string(nLevels, '}');
    std::vector<ref<EveryTypeLazy>> objects;
    {
        ref<SornObject> outermost;
        RoxString words;
        ASSERT_TRUE(
            JsonSornObject(&pool).JsonToSornObject(reinterpret_cast<const unsigned char*>(text.data()),
                                                   static_cast<int>(text.size()), 0, &outermost, words));
        objects.emplace_back(static_cast<EveryTypeLazy*>(outermost.get()));
    }
    while (objects.size() < nLevels && !HasFailure()) {
        objects.push_back(ReadLazy(objects.back()->body->GetStoredBytesource()));
    }
    EXPECT_LT(pool.GetUsedBytes(), 16u << 20);
    EXPECT_TRUE(TextOf(*objects.back()->body) == core);
}

}  // namespace sorntest
