// Peak memory of reading text, against the size of the input. Invariant for untrusted input: 11.

#include <fstream>

#include "convert/RawText.h"
#include "pairs/BodyModel.h"
#include "pairs/Hostile.h"
#include "pairs/LibraryForms.h"
#include "pairs/MemoryFixture.h"
#include "rox/RoxFeatures.h"
#include "sorn/lazy/LazyDict.h"

namespace sorntest {

using namespace sorn;

class MemoryTest : public MemoryFixture {
 protected:
    struct Shape {
        const char* name;
        std::string text;
    };

    static std::vector<std::string> Lines(const char* name);
    static std::string ListOf(const char* file, const std::string& type, size_t size);
    static std::string Listed(const std::string& piece, size_t size);
    static std::string Nested(const std::string& open, const std::string& close, size_t size);
    static std::string ManyKeys(size_t size);
    /// A record with other text in place of its last brace.
    static std::string Continued(const std::string& record, const std::string& text) {
        return record.substr(0, record.size() - 1) + text;
    }
    static std::vector<Shape> Shapes(size_t size);
    static std::vector<Shape> BadShapes(size_t size);
};

std::vector<std::string> MemoryTest::Lines(const char* name) {
    std::ifstream file(std::string(SORN_SOURCE_DIR "/examples/data/") + name + ".jsonl");
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);) lines.push_back(line);
    return lines;
}

/// The examples of a file that are of a struct, again and again, as the list that a service answers with.
std::string MemoryTest::ListOf(const char* file, const std::string& type, size_t size) {
    std::string text = "{\"type\": \"" + type + "List\", \"" + type + "\": [";
    const std::string sign = "\"type\": \"" + type + "\"";
    size_t n = 0;
    while (text.size() < size) {
        for (const std::string& line : Lines(file)) {
            std::string words;
            if (line.find(sign) == std::string::npos || line.rfind(sign) < line.size() - 400) continue;
            if (text.size() < size) text += (n++ == 0 ? "" : ",") + line;
        }
    }
    return text + "]}";
}

/// `piece` in lists of no more than a container holds, under names of their own.
std::string MemoryTest::Listed(const std::string& piece, size_t size) {
    std::string text = "{\"type\":\"success\"";
    for (size_t n = 0; text.size() < size; ++n) {
        text += Format(",\"l%zu\":[", n);
        for (size_t i = 0; i < 60000 && text.size() < size; ++i) text += (i == 0 ? "" : ",") + piece;
        text += "]";
    }
    return text + "}";
}

std::string MemoryTest::Nested(const std::string& open, const std::string& close, size_t size) {
    const size_t n = size / (open.size() + close.size());
    std::string text;
    for (size_t i = 0; i < n; ++i) text += open;
    for (size_t i = 0; i < n; ++i) text += close;
    return text;
}

std::string MemoryTest::ManyKeys(size_t size) {
    std::string text = "{\"type\":\"success\"";
    for (size_t i = 0; text.size() < size; ++i) text += Format(",\"%zx\":1", i);
    return text + "}";
}

std::vector<MemoryTest::Shape> MemoryTest::Shapes(size_t size) {
    const std::string companion = "{\"type\":\"everyTypeCompanion\",";
    return {
        {"empty objects in lists", Listed("{}", size)},
        {"empty lists in lists", Listed("[]", size)},
        {"digits in lists", Listed("1", size)},
        {"empty strings in lists", Listed("\"\"", size)},
        {"many names", ManyKeys(size)},
        {"objects in objects",
         companion + "\"x\":" + Nested("{\"a\":", "}", size).insert(size / 6 * 5, "1") + "}"},
        {"lists in lists in lists", companion + "\"x\":" + Nested("[", "]", size) + "}"},
        {"one long string", companion + "\"label\":\"" + std::string(size, 'a') + "\"}"},
        {"one long string of escapes", companion + "\"label\":\"" + Repeated("\\n", size) + "\"}"},
        {"blanks", companion + std::string(size, ' ') + "\"label\":\"\"}"},
        {"objects of a field", InField("everyTypeCompanion", "children", "{}", size)},
        {"objects of a field in each other", companion + Nested("\"child\":{", "}", size) + "}"},
        {"strings of a field", InField("everyType", "multiString", "\"\"", size)},
        {"byte strings of a field", InField("everyType", "multiBytes", "\"\"", size)},
        {"byte strings of bad text", InField("everyType", "multiBytes", "Q", size)},
        {"byte strings of one byte", InField("everyType", "multiBytes", "\"QQ==\"", size)},
        {"digits of a field", InField("everyType", "multiS64", "1", size)},
        {"any-dicts of a field", InField("everyType", "multiAnyDict", "{a:1}", size)},
        {"bodies of a field", InField("everyType", "multiLazy", "{}", size)},
        {"names of an any-dict", companion + "\"dict\":" + ManyKeys(size) + "}"},
        {"any-dicts in any-dicts",
         companion + "\"dict\":" + Nested("{\"a\":", "}", size).insert(size / 6 * 5, "1") + "}"},
        {"digits of an any-dict",
         companion + "\"dict\":{\"a\":[1" + Repeated(",1", size < 100000 ? size : 100000) + "]}}"},
    };
}

/// None can be read, most for what stands at their end.
std::vector<MemoryTest::Shape> MemoryTest::BadShapes(size_t size) {
    const std::string companion = "{\"type\":\"everyTypeCompanion\",";
    return {
        {"objects that do not end", Repeated("{\"a\":", size)},
        {"objects that do not end, bare", Repeated("{a:", size)},
        {"brackets", Repeated("[", size)},
        {"braces", Repeated("{", size)},
        {"lists that do not end", companion + "\"x\":" + Repeated("[", size)},
        {"lists and objects that do not end", companion + "\"x\":" + Repeated("[{\"a\":", size)},
        {"objects of a field that do not end", companion + Repeated("\"child\":{", size)},
        {"lists of a field that do not end", companion + Repeated("\"children\":[{", size)},
        {"any-dicts that do not end", companion + "\"dict\":" + Repeated("{\"a\":", size)},
        {"bodies that do not end", "{\"type\":\"everyTypeLazy\",\"body\":" + Repeated("{\"a\":", size)},
        {"a bad text in objects", companion + "\"x\":" + Repeated("{\"a\":", size) + "\"\\q\""},
        {"a bad text in lists", companion + "\"x\":" + Repeated("[", size) + "\"\\q\""},
        {"a bad text behind a long name", companion + "\"" + std::string(size, 'a') + "\":\"\\q\"}"},
        {"a long text that does not end", companion + "\"label\":\"" + std::string(size, 'a')},
        {"a bad text behind many names", Continued(ManyKeys(size), ",\"x\":\"\\q\"}")},
        {"a bad number behind objects",
         Continued(InField("everyTypeCompanion", "children", "{}", size), ",\"number\":x}")},
    };
}

TEST_F(MemoryTest, RealisticRecords) {
    struct Source {
        const char* file;
        const char* type;
    };
    for (const Source& source :
         {Source{"recordings", "recording"}, Source{"offers", "offer"}, Source{"channels", "channel"}}) {
        for (size_t size : {5 * KiB, 500 * KiB, 5 * MiB}) {
            const std::string text = ListOf(source.file, source.type, size);
            for (Codec codec :
                 {Codec::handParser, Codec::streamParser, Codec::typedMemory, Codec::typedStream}) {
                ExpectFactor(source.type, codec, text, 8, true);
            }
            Report(source.type, Codec::dictionaryRoad, Measure(Codec::dictionaryRoad, text));
            RoxMempool pool("binary");
            RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
            const ref<LazyDict> lazy = LazyDict::FromBytesource(&pool, new PieceSource(text, UINT32_MAX), 0);
            RoxString error;
            const ref<SornObject> object = lazy->ToSornObjectOrErrorString(error);
            ASSERT_NE(object, nullptr);
            const std::string binary = BytesOf(LazyDict::FromSornObject(&pool, object, 0)->ToProtobuf());
            ExpectFactor(source.type, Codec::binary, binary, 8, true);
        }
    }
}

TEST_F(MemoryTest, WorstShapes) {
    for (const Shape& shape : Shapes(500 * KiB)) {
        for (Codec codec : {Codec::handParser, Codec::streamParser, Codec::typedMemory, Codec::typedStream}) {
            ExpectFactor(shape.name, codec, shape.text, 64, false);
        }
    }
}

// Nests that do not end cost the dictionary readers their values and the words of each level at once.
TEST_F(MemoryTest, ReadsThatFail) {
    const struct {
        Codec codec;
        double limit;
    } readers[] = {{Codec::handParser, 120},
                   {Codec::streamParser, 66},
                   {Codec::typedMemory, 48},
                   {Codec::typedStream, 48}};
    for (const Shape& shape : BadShapes(500 * KiB)) {
        for (const auto& reader : readers) {
            ExpectFactor(shape.name, reader.codec, shape.text, reader.limit, false);
            // A word where a number belongs is nothing to those who know no fields.
            if (reader.codec < Codec::typedMemory) continue;
            EXPECT_FALSE(Measure(reader.codec, shape.text).isRead) << shape.name;
        }
    }
}

}  // namespace sorntest
