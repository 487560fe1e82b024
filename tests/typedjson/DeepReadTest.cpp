// Nesting costs memory of the pool and none of the thread's stack: all on 256 KiB. Invariants for untrusted
// input: 3, 4, 9.

#include "sorn/dict/Dict.h"
#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"
#include "support/SmallStack.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryTypeCompanion;

// ThreadSanitizer maps its shadow of each piece of the pool apart, and the system allows a process 65,530
// mappings.
#ifdef __SANITIZE_THREAD__
constexpr unsigned nLevelsG = 100000;
#else
constexpr unsigned nLevelsG = 1000000;
#endif

class DeepReadTest : public ReaderFixture {
 protected:
    static std::string Times(unsigned n, const char* text) {
        std::string out;
        for (unsigned i = 0; i < n; ++i) out += text;
        return out;
    }
    static constexpr const char* singleG = " failed to UnmarshalOneSingleValue in ReadFieldValue";
    static constexpr const char* keyG = " Failed to parse value for key a";
    static constexpr const char* elementG = " Failed to parse an array element.";
    /// Bytes of the words of a failure that has more to tell than may be told: those of the cause, two pieces
    /// in turns as far as 1 MiB goes, and what closes them.
    static size_t CutWords(const char* cause, const char* first, const char* second) {
        const size_t nPair = strlen(first) + strlen(second);
        size_t n = 1048576 / nPair * nPair;
        if (n + strlen(first) <= 1048576) n += strlen(first);
        return strlen(cause) + n + strlen(" The rest of the words is left out.");
    }
    /// Reads a text both ways on the small stack; gives the object from memory.
    void Run(const std::string& text, bool isGood, size_t nWords,
             const std::function<void(SornObject*)>& test = nullptr) {
        RunOnSmallStack([&] {
            ref<SornObject> object;
            RoxString words;
            EXPECT_EQ(
                JsonSornObject(&pool).JsonToSornObject(reinterpret_cast<const unsigned char*>(text.data()),
                                                       static_cast<int>(text.size()), 0, &object, words),
                isGood);
            EXPECT_EQ(words.NByte(), nWords);
            if (isGood && test) test(object.get());
            object = nullptr;
            PieceSource* const source = new PieceSource(text, 16384);
            RoxString streamWords;
            unsigned bytesRead = 0;
            EXPECT_EQ(JsonSornObject(&pool).JsonToSornObject(source, bytesRead, 0, &object, streamWords),
                      isGood);
            EXPECT_EQ(streamWords, words);
            source->Release();
        });
    }
};

TEST_F(DeepReadTest, Objects) {
    const std::string text =
        "{\"type\":everyTypeCompanion," + Times(nLevelsG, "child:{") + Times(nLevelsG, "}") + "}";
    Run(text, true, 0, [](SornObject* object) {
        unsigned n = 0;
        for (; object != nullptr; object = static_cast<EveryTypeCompanion*>(object)->child.get()) ++n;
        EXPECT_EQ(n, nLevelsG + 1);
    });
}

TEST_F(DeepReadTest, ObjectsInLists) {
    const std::string text = "{\"type\":everyTypeCompanion," + Times(nLevelsG / 2, "children:[[{") +
                             Times(nLevelsG / 2, "}]]") + "}";
    Run(text, true, 0);
}

TEST_F(DeepReadTest, UnknownObjectsAndArrays) {
    Run("{type:success," + Times(nLevelsG, "a:{") + Times(nLevelsG, "}") + "}", true, 0);
    Run("{type:success,a:" + Times(5 * nLevelsG, "[") + Times(5 * nLevelsG, "]") + "}", true, 0);
    Run("{type:everyType,multiS32:" + Times(5 * nLevelsG, "[") + "1" + Times(5 * nLevelsG, "]") + "}", true,
        0);
}

TEST_F(DeepReadTest, AnyDicts) {
    Run("{type:everyTypeCompanion,dict:{" + Times(nLevelsG, "a:{") + "b:1" + Times(nLevelsG, "}") + "}}",
        true, 0);
    Run("{type:everyTypeCompanion,dict:{" + Times(nLevelsG, "a:{") + "b 1" + Times(nLevelsG, "}") + "}}",
        false, CutWords("JSON field name must be followed by a colon.", singleG, keyG));
}

TEST_F(DeepReadTest, LazyBodies) {
    Run("{type:everyTypeLazy,body:{" + Times(nLevelsG, "body:{") + Times(nLevelsG, "}") + "}}", true, 0);
}

// As far as ObjectReaderWords::maxBytesG, 1 MiB of what is appended.
TEST_F(DeepReadTest, WordsGrowWithTheDepth) {
    constexpr unsigned n = 10000;
    Run(Times(n, "{a:"), false,
        strlen("JSON object does not end with '}'.") + (n - 1) * (strlen(singleG) + strlen(keyG)));
    Run(Times(nLevelsG, "{a:"), false, CutWords("JSON object does not end with '}'.", singleG, keyG));
    Run("{a:" + Times(n, "["), false,
        strlen("Array must end with ']'.") + (n - 1) * strlen(elementG) + strlen(keyG));
    Run("{a:" + Times(nLevelsG, "["), false, CutWords("Array must end with ']'.", elementG, elementG));
}

TEST_F(DeepReadTest, AFailureDeepInsideStaysUntold) {
    Run("{type:everyTypeCompanion," + Times(nLevelsG, "child:{") + "number:x" + Times(nLevelsG, "}") + "}",
        false,
        strlen(" failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key child"));
}

}  // namespace sorntest
