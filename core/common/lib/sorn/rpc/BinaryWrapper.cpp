// The part of ProtoBuf that reads messages of the older form: it needs records and lazy bodies.

#include "sorn/binary/GoogleInt.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/Error.h"
#include "sornschema/OrvoRpcCancel.h"
#include "sornschema/OrvoRpcHello.h"
#include "sornschema/OrvoRpcRequest.h"
#include "sornschema/OrvoRpcResponse.h"

namespace sorn {

namespace {

using sornschema::OrvoRpcCancel;
using sornschema::OrvoRpcHello;
using sornschema::OrvoRpcRequest;
using sornschema::OrvoRpcResponse;

constexpr uint32_t badArgumentG = 3;  // of errorCode
constexpr char badMessageG[] = "wrapper did not unmarshal";

ref<SornObject> NewError(RoxMempool* pool, const char* words) {
    ref<sornschema::Error> error(new (pool) sornschema::Error);
    error->code = badArgumentG;
    error->text = RoxString(pool, words);
    return error;
}

struct Range {
    const unsigned char* cursor;
    const unsigned char* end;
};

bool ReadBool(Range& in, bool& value) {
    unsigned number = 0;
    if (!GoogleInt::ReadGoogleU32(&in.cursor, in.end, &number) || number > 1) return false;
    value = number != 0;
    return true;
}

bool ReadS32(Range& in, int32_t& value) {
    int number = 0;
    if (!GoogleInt::ReadGoogleS32(&in.cursor, in.end, &number)) return false;
    value = number;
    return true;
}

/// A length and as many bytes.
bool ReadBytes(Range& in, Range& bytes) {
    unsigned n = 0;
    if (!GoogleInt::ReadGoogleU32(&in.cursor, in.end, &n)) return false;
    if (n > static_cast<size_t>(in.end - in.cursor)) return false;
    bytes = {in.cursor, in.cursor + n};
    in.cursor += n;
    return true;
}

// One field of a message by its number, whatever its wire type; false for a number that is none of these.

bool ReadField(Range& in, unsigned number, OrvoRpcRequest& request, Range& body) {
    switch (number) {
        case 1:
            return ReadBool(in, request.monitorFutureChanges);
        case 2:
            return ReadBytes(in, body);
        case 3:
            return ReadS32(in, request.rpcId);
        case 4:
            return ReadS32(in, request.orvoVersion);
        case 5: {
            unsigned long long id = 0;
            if (!GoogleInt::ReadGoogleU64(&in.cursor, in.end, &id)) return false;
            request.partnerId = static_cast<uint32_t>(id);
            request.partnerId_isSet = 1;
            return true;
        }
        case 6:
            request.sendAndForget_isSet = 1;
            return ReadBool(in, request.sendAndForget);
        default:
            return false;
    }
}

bool ReadField(Range& in, unsigned number, OrvoRpcResponse& response, Range& body) {
    switch (number) {
        case 1:
            return ReadBool(in, response.isFinalResponse);
        case 2:
            return ReadBytes(in, body);
        case 3:
            return ReadS32(in, response.rpcId);
        default:
            return false;
    }
}

void SetBody(OrvoRpcRequest& request, const ref<LazyDict>& body) {
    request.request = body;
}

void SetBody(OrvoRpcResponse& response, const ref<LazyDict>& body) {
    response.response = body;
}

const char* BadBodyWords(const OrvoRpcRequest&) {
    return "request did not unmarshal";
}

const char* BadBodyWords(const OrvoRpcResponse&) {
    return "response did not unmarshal";
}

}  // namespace

template <class Message>
ref<SornObject> ProtoBuf::UnmarshalMessage(const unsigned char** cursor, const unsigned char* end) const {
    Range in{*cursor, end};
    unsigned length = 0;
    if (!GoogleInt::ReadGoogleU32(&in.cursor, in.end, &length)) return NewError(pMempoolM, badMessageG);
    if (length != static_cast<size_t>(in.end - in.cursor)) {
        return NewError(pMempoolM, "wrapper did not unmarshal: length");
    }
    ref<Message> message(new (pMempoolM) Message);
    Range body{nullptr, nullptr};
    while (in.cursor != in.end) {
        unsigned tag = 0;
        if (!GoogleInt::ReadGoogleU32(&in.cursor, in.end, &tag) || !ReadField(in, tag / 8, *message, body)) {
            return NewError(pMempoolM, badMessageG);
        }
    }
    *cursor = in.cursor;
    if (body.cursor == nullptr) return NewError(pMempoolM, badMessageG);
    ref<SornObject> object;  // bytes behind the body's value are no fault
    if (!UnmarshalKnownDictValue(&body.cursor, body.end, &object)) {
        object = NewError(pMempoolM, BadBodyWords(*message));
    }
    SetBody(*message, LazyDict::FromSornObject(pMempoolM, object, 0));
    return message;
}

ref<SornObject> ProtoBuf::UnmarshalRequestWrapper(const unsigned char** cursor,
                                                  const unsigned char* end) const {
    return UnmarshalMessage<OrvoRpcRequest>(cursor, end);
}

ref<SornObject> ProtoBuf::UnmarshalResponseWrapper(const unsigned char** cursor,
                                                   const unsigned char* end) const {
    return UnmarshalMessage<OrvoRpcResponse>(cursor, end);
}

ref<SornObject> ProtoBuf::UnmarshalWrapper(const unsigned char* data, int length) const {
    const unsigned char* cursor = data;
    const unsigned char* const end = length > 0 ? data + length : data;
    unsigned tag = 0;
    if (!GoogleInt::ReadGoogleU32(&cursor, end, &tag)) {
        return NewError(pMempoolM, "does not start with valid int");
    }
    switch (const unsigned structId = tag / 8; structId) {
        case OrvoRpcRequest::structIdG:
            return UnmarshalRequestWrapper(&cursor, end);
        case OrvoRpcResponse::structIdG:
            return UnmarshalResponseWrapper(&cursor, end);
        case OrvoRpcCancel::structIdG:
        case OrvoRpcHello::structIdG: {
            ref<SornObject> object;
            if (UnmarshalKnownDict(data, length, &object)) return object;
            return NewError(pMempoolM, "failed to unmarshal");
        }
        default:
            return NewError(pMempoolM, RoxString::Format("bad object type: %u", structId).Utf8());
    }
}

}  // namespace sorn
