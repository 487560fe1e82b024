// A message of the older, binary form of any bytes. Invariants 1 to 4, 8, 9 and 14.
//
// There is always a record: a message, or an error with the code for a bad argument and words. A message
// marshals to bytes that are read as a message of the same bytes, and becomes a message of the text form.
#include <string>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/RecordContents.h"
#include "fuzz/support/Texts.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/model/Schema.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sornschema/Error.h"
#include "sornschema/OrvoRpcCancel.h"
#include "sornschema/OrvoRpcHello.h"
#include "sornschema/OrvoRpcRequest.h"
#include "sornschema/OrvoRpcResponse.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

constexpr uint32_t badArgumentG = 3;

bool FMessage(const sorn::SornObject& object) {
    switch (object.structId) {
        case sornschema::OrvoRpcCancel::structIdG:
        case sornschema::OrvoRpcHello::structIdG:
        case sornschema::OrvoRpcRequest::structIdG:
        case sornschema::OrvoRpcResponse::structIdG:
            return true;
        default:
            return false;
    }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const sorn::ProtoBuf codec(pool.Get(), sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    const ref<sorn::SornObject> object = codec.UnmarshalWrapper(data, static_cast<int>(size));
    Check(object != nullptr, "no record");
    if (!FMessage(*object)) {
        Check(object->structId == sornschema::Error::structIdG, "a record that is no message");
        const auto& error = static_cast<const sornschema::Error&>(*object);
        Check(error.code == badArgumentG && !error.text.FEmpty(), "an error without its code or words");
        return 0;
    }
    const std::string bytes = BinaryForm(*object, pool.Get());
    if (!RecordContents::Of(object).hasUnreadableScalar) {
        const ref<sorn::SornObject> again = codec.UnmarshalWrapper(
            reinterpret_cast<const unsigned char*>(bytes.data()), static_cast<int>(bytes.size()));
        Check(again->structId == object->structId, "a message changed its struct");
        Check(BinaryForm(*again, pool.Get()) == bytes, "a message read back marshals to other bytes");
    }
    const ref<sorn::OrvoRpcWrapper> message = sorn::OrvoRpcV2::OrvoRpcV1ToV2Wrapper(pool.Get(), object);
    Check(message != nullptr, "no message of a record");
    sorn::OrvoRpcV2::MarshalToString(pool.Get(), message, false);
    return 0;
}
