// Nesting costs memory of the pool and none of the thread's stack: all on 256 KiB.

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
        false,
        strlen("JSON field name must be followed by a colon.") +
            (nLevelsG + 1) * strlen(" failed to UnmarshalOneSingleValue in ReadFieldValue") +
            (nLevelsG + 1) * strlen(" Failed to parse value for key a") + strlen("dict") - 1);
}

TEST_F(DeepReadTest, LazyBodies) {
    Run("{type:everyTypeLazy,body:{" + Times(nLevelsG, "body:{") + Times(nLevelsG, "}") + "}}", true, 0);
}

TEST_F(DeepReadTest, WordsGrowWithTheDepth) {
    Run(Times(nLevelsG, "{a:"), false,
        strlen("JSON object does not end with '}'.") +
            (nLevelsG - 1) * strlen(" failed to UnmarshalOneSingleValue in ReadFieldValue"
                                    " Failed to parse value for key a"));
    Run("{a:" + Times(nLevelsG, "["), false,
        strlen("Array must end with ']'.") + (nLevelsG - 1) * strlen(" Failed to parse an array element.") +
            strlen(" Failed to parse value for key a"));
}

TEST_F(DeepReadTest, AFailureDeepInsideStaysUntold) {
    Run("{type:everyTypeCompanion," + Times(nLevelsG, "child:{") + "number:x" + Times(nLevelsG, "}") + "}",
        false,
        strlen(" failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key child"));
}

}  // namespace sorntest
