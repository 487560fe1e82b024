// Peak memory of reading the binary form, and of large objects, against the size of the input. Invariant for
// untrusted input: 11.

#include <vector>

#include "pairs/HeapMeter.h"
#include "pairs/MemoryFixture.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

using BinaryMemoryTest = MemoryFixture;

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

TEST_F(BinaryMemoryTest, WorstShapes) {
    constexpr size_t size = 120 * KiB;
    constexpr unsigned everyType = 5921;
    constexpr unsigned companion = 5919;
    const std::string any = std::string("\x22\x06\x32\x00\x42\x02\x12", 7) + std::string(1, '\0');
    const struct {
        const char* name;
        std::string text;
    } shapes[] = {
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
    for (const auto& shape : shapes) ExpectFactor(shape.name, Codec::binary, shape.text, 64, false);
}

// Two bytes of text can ask for an object of two thousand: what a reading spends on such objects has a bound
// of its own.
TEST_F(BinaryMemoryTest, LargeObjectsWithoutValues) {
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
