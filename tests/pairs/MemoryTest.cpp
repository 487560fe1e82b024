// Peak memory of reading, pool and general heap together, against the size of the input.

#include <cinttypes>
#include <fstream>

#include "convert/RawText.h"
#include "pairs/BodyModel.h"
#include "pairs/HeapMeter.h"
#include "pairs/Hostile.h"
#include "pairs/LibraryForms.h"
#include "pairs/PairsFixture.h"
#include "rox/RoxFeatures.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

namespace {

constexpr size_t KiB = 1024;
constexpr size_t MiB = 1024 * KiB;
constexpr size_t freeBytes = 64 * KiB;

enum class Codec { handParser, streamParser, typedMemory, typedStream, binary, dictionaryRoad };
const char* const codecNames[] = {"hand parser",         "stream parser", "typed reader",
                                  "typed stream reader", "binary",        "dictionary road"};

struct Measured {
    bool isRead;
    size_t peak;
    size_t input;
    double Factor() const {
        return static_cast<double>(peak < freeBytes ? 0 : peak - freeBytes) / static_cast<double>(input);
    }
};

/// The peak of one reading in a pool of its own; the input lies elsewhere.
Measured Measure(Codec codec, const std::string& input) {
    RoxMempool inputPool("input");
    RoxMempool pool("measured");
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON,
                            codec == Codec::typedMemory || codec == Codec::typedStream);
    bool isStream = codec == Codec::streamParser || codec == Codec::typedStream;
    ref<LazyDict> lazy;
    if (isStream) {
        lazy = LazyDict::FromBytesource(&pool, new PieceSource(input, UINT32_MAX), 0);
    } else {
        lazy = LazyDict::FromBytestring(
            &pool, rox::ByteBuffer::New(&inputPool, input.data(), static_cast<uint32_t>(input.size())), 0);
    }
    HeapMeter::ResetPeak();
    const size_t before = HeapMeter::Used();
    RoxString error;
    bool isRead = codec == Codec::handParser || codec == Codec::streamParser
                      ? lazy->ToDictionary(error) != nullptr
                      : lazy->ToSornObjectOrErrorString(error) != nullptr;
    return Measured{isRead, pool.GetUsedBytesHighWater() + HeapMeter::Peak() - before, input.size()};
}

void Report(const std::string& what, Codec codec, const Measured& measured) {
    printf("%-34s %-20s %9zu bytes, peak %10zu, factor %6.2f%s\n", what.c_str(),
           codecNames[static_cast<int>(codec)], measured.input, measured.peak, measured.Factor(),
           measured.isRead ? "" : ", refused");
}

std::vector<std::string> Lines(const char* name) {
    std::ifstream file(std::string(SORN_SOURCE_DIR "/examples/data/") + name + ".jsonl");
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);) lines.push_back(line);
    return lines;
}

/// The examples of a file that are of a struct, again and again, as the list that a service answers with.
std::string ListOf(const char* file, const std::string& type, size_t size) {
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

std::string Repeated(const std::string& piece, size_t size) {
    std::string text;
    while (text.size() < size) text += piece;
    return text;
}

/// `piece` in lists of no more than a container holds, under names of their own.
std::string Listed(const std::string& piece, size_t size) {
    std::string text = "{\"type\":\"success\"";
    for (size_t n = 0; text.size() < size; ++n) {
        text += Format(",\"l%zu\":[", n);
        for (size_t i = 0; i < 60000 && text.size() < size; ++i) text += (i == 0 ? "" : ",") + piece;
        text += "]";
    }
    return text + "}";
}

/// The same in one list of a field that has one.
std::string InField(const char* type, const char* field, const std::string& piece, size_t size) {
    std::string text = Format("{\"type\":\"%s\",\"%s\":[", type, field) + piece;
    for (size_t i = 0; i < 60000 && text.size() < size; ++i) text += "," + piece;
    return text + "]}";
}

std::string Nested(const std::string& open, const std::string& close, size_t size) {
    const size_t n = size / (open.size() + close.size());
    std::string text;
    for (size_t i = 0; i < n; ++i) text += open;
    for (size_t i = 0; i < n; ++i) text += close;
    return text;
}

std::string ManyKeys(size_t size) {
    std::string text = "{\"type\":\"success\"";
    for (size_t i = 0; text.size() < size; ++i) text += Format(",\"%zx\":1", i);
    return text + "}";
}

struct Shape {
    const char* name;
    std::string text;
};

std::vector<Shape> TextShapes(size_t size) {
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

}  // namespace

class MemoryTest : public ::testing::Test {
 protected:
    void TearDown() override { RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false); }

    void ExpectFactor(const std::string& what, Codec codec, const std::string& input, double limit,
                      bool mustRead) {
        const Measured measured = Measure(codec, input);
        Report(what, codec, measured);
        // A sanitizer's pool puts room between its blocks.
        if (!HeapMeter::FCounts()) limit *= 4;
        EXPECT_LE(measured.Factor(), limit) << what << ", " << codecNames[static_cast<int>(codec)];
        if (mustRead) {
            EXPECT_TRUE(measured.isRead) << what;
        }
    }
};

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

TEST_F(MemoryTest, WorstShapesOfText) {
    for (const Shape& shape : TextShapes(500 * KiB)) {
        for (Codec codec : {Codec::handParser, Codec::streamParser, Codec::typedMemory, Codec::typedStream}) {
            ExpectFactor(shape.name, codec, shape.text, 64, false);
        }
    }
}

namespace {

std::string Varint(uint64_t number) {
    std::string out;
    for (; number >= 0x80; number >>= 7) out += static_cast<char>((number & 0x7F) | 0x80);
    return out + static_cast<char>(number);
}

std::string Known(unsigned structId, const std::string& fields) {
    return Varint(structId * 8 + 2) + Varint(fields.size()) + fields;
}

/// Field of a slot with wire type 2.
std::string Field(unsigned slot, const std::string& bytes) {
    return Varint(slot * 8 + 2) + Varint(bytes.size()) + bytes;
}

/// Sections in each other, each behind the first tag and inside it behind the second one, if there is any.
std::string NestedSections(const std::string& outer, const std::string& inner, size_t size) {
    // From the inside out, written backwards.
    std::string reversed;
    auto wrap = [&](const std::string& tag) {
        const std::string head = tag + Varint(reversed.size());
        reversed.append(head.rbegin(), head.rend());
    };
    while (reversed.size() < size) {
        if (!inner.empty()) wrap(inner);
        wrap(outer);
    }
    return std::string(reversed.rbegin(), reversed.rend());
}

}  // namespace

TEST_F(MemoryTest, WorstShapesOfBinary) {
    constexpr size_t size = 120 * KiB;
    constexpr unsigned everyType = 5921;
    constexpr unsigned companion = 5919;
    const std::string any = std::string("\x22\x06\x32\x00\x42\x02\x12", 7) + std::string(1, '\0');
    const std::vector<Shape> shapes = {
        {"digits of a field", Known(everyType, Repeated(Varint(15 * 8) + "\x01", size))},
        {"truths of a field", Known(everyType, Repeated(Varint(2 * 8) + "\x01", size))},
        {"strings of a field", Known(everyType, Repeated(Field(17, ""), size))},
        {"byte strings of a field", Known(everyType, Repeated(Field(3, ""), size))},
        {"any-dicts of a field", Known(everyType, Repeated(Field(1, ""), size))},
        {"byte strings of one byte", Known(everyType, Repeated(Field(3, "a"), size))},
        {"bodies of one byte", Known(everyType, Repeated(Field(12, "{"), size))},
        {"bodies of a field", Known(everyType, Repeated(Field(12, Known(companion, "")), size))},
        {"known records of a field", Known(everyType, Repeated(Field(11, Known(companion, "")), size))},
        {"objects of a field", Known(companion, Repeated(Field(2, ""), size))},
        {"objects in each other", Known(companion, NestedSections(Varint(1 * 8 + 2), "", size))},
        {"values of an any-dict",
         Known(companion, Field(4, Repeated(std::string("\x22\x04\x32\x00\x42\x00", 6), size)))},
        {"empty values of a name",
         Known(companion, Field(4, "\x22" + Varint(2 + size) + std::string("\x32\x00", 2) +
                                       Repeated(std::string("\x42\x00", 2), size)))},
        {"any-dicts in any-dicts",
         Known(companion, Field(4, NestedSections("\x22", std::string("\x32\x00\x42", 3), size)))},
        {"an any-dict again and again", Known(companion, Repeated(Field(4, any), size))},
    };
    for (const Shape& shape : shapes) ExpectFactor(shape.name, Codec::binary, shape.text, 64, false);
}

// Two bytes of text can ask for an object of two thousand: what a reading spends on such objects has a bound
// of its own.
TEST_F(MemoryTest, LargeObjectsWithoutValues) {
    constexpr size_t freeOfObjects = 40 * MiB;  // the 32 MiB of ObjectBudget, as pools round them up
    constexpr size_t n = 60000;
    constexpr unsigned recordingList = 470;
    ASSERT_STREQ(Schema::FindStruct(recordingList)->name, "recordingList");
    unsigned slot = 1;
    while (Schema::FindStruct(recordingList)->vFieldInfo[slot].dataType != 14) ++slot;
    const std::string text = InField("recordingList", "recording", "{}", n * 3);
    const std::string binary = Known(recordingList, Repeated(Field(slot, ""), n * 2));
    for (Codec codec : {Codec::typedMemory, Codec::typedStream, Codec::binary}) {
        const std::string& input = codec == Codec::binary ? binary : text;
        const Measured measured = Measure(codec, input);
        Report("large objects of a field", codec, measured);
        EXPECT_FALSE(measured.isRead);
        EXPECT_LE(measured.peak,
                  (HeapMeter::FCounts() ? 1u : 4u) * (freeOfObjects + freeBytes + 64 * input.size()));
    }
    Report("large objects of a field", Codec::handParser, Measure(Codec::handParser, text));
}

}  // namespace sorntest
