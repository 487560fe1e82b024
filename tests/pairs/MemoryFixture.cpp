#include "pairs/MemoryFixture.h"

#include "convert/RawText.h"
#include "pairs/BodyModel.h"
#include "pairs/HeapMeter.h"
#include "pairs/Hostile.h"
#include "rox/RoxFeatures.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"

namespace sorntest {

using namespace sorn;

namespace {

const char* const codecNames[] = {"hand parser",         "stream parser", "typed reader",
                                  "typed stream reader", "binary",        "dictionary road"};

}  // namespace

MemoryFixture::Measured MemoryFixture::MeasureOnce(Codec codec, const std::string& input) {
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

MemoryFixture::Measured MemoryFixture::Measure(Codec codec, const std::string& input) {
    MeasureOnce(codec, input);
    return MeasureOnce(codec, input);
}

void MemoryFixture::Report(const std::string& what, Codec codec, const Measured& measured) {
    printf("%-34s %-20s %9zu bytes, peak %10zu, factor %6.2f%s\n", what.c_str(),
           codecNames[static_cast<int>(codec)], measured.input, measured.peak, measured.Factor(),
           measured.isRead ? "" : ", refused");
}

void MemoryFixture::ExpectFactor(const std::string& what, Codec codec, const std::string& input, double limit,
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

void MemoryFixture::TearDown() {
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
}

std::string MemoryFixture::Repeated(const std::string& piece, size_t size) {
    std::string text;
    while (text.size() < size) text += piece;
    return text;
}

std::string MemoryFixture::InField(const char* type, const char* field, const std::string& piece,
                                   size_t size) {
    std::string text = Format("{\"type\":\"%s\",\"%s\":[", type, field) + piece;
    for (size_t i = 0; i < 60000 && text.size() < size; ++i) text += "," + piece;
    return text + "]}";
}

}  // namespace sorntest
