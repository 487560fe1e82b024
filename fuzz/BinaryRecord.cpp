// The binary form of any record. Invariants 1 to 4, 6 to 9, 12 and 14.
//
// What decodes marshals to bytes that decode to a record of the same bytes; decoding with and without copies
// gives the same verdict and the same record.
#include <string>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/RecordContents.h"
#include "fuzz/support/Texts.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/Schema.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

void CheckStable(const ref<sorn::SornObject>& record, const sorn::ProtoBuf& codec, RoxMempool* pool) {
    const std::string first = BinaryForm(*record, pool);
    // An exact-size copy, so that an access beyond it is seen.
    const ref<rox::ByteBuffer> bytes =
        rox::ByteBuffer::New(pool, first.data(), static_cast<uint32_t>(first.size()));
    ref<sorn::SornObject> again;
    if (RecordContents::Of(record).hasUnreadableScalar) return;  // and no reader takes it
    Check(codec.UnmarshalKnownDict(bytes->GetData(), static_cast<int>(bytes->GetLength()), &again),
          "what was marshalled does not unmarshal");
    Check(again->structId == record->structId, "a record changed its struct");
    Check(BinaryForm(*again, pool) == first, "a record read back marshals to other bytes");
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const sorn::ProtoBuf codec(pool.Get(), sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    ref<sorn::SornObject> record;
    const bool isGood = codec.UnmarshalKnownDict(data, static_cast<int>(size), &record);
    Check(isGood == (record != nullptr), "verdict and result differ");

    const ref<rox::ByteBuffer> bytes = rox::ByteBuffer::New(pool.Get(), data, static_cast<uint32_t>(size));
    ref<sorn::SornObject> sharing;
    Check(codec.UnmarshalKnownDict(bytes, &sharing) == isGood, "the verdict differs when bytes are shared");
    if (!isGood) return 0;

    Check(BinaryForm(*sharing, pool.Get()) == BinaryForm(*record, pool.Get()),
          "the record differs when bytes are shared");
    CheckStable(record, codec, pool.Get());
    WriteEverywhere(*record, pool.Get());
    return 0;
}
