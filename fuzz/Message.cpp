// An ORPC/2 message of any bytes. Invariants 1, 2, 4, 6, 9, 10 and 14.
//
// A refusal has words, unless the first line is not complete. What is accepted with its body read is accepted
// without; what is accepted can be marshalled, and is read back as the same message, which marshals to the
// same bytes. A sink gets the same, but for a body in the binary form, whose text a sink gets in another
// order. Messages become records of the older form and come back.
#include <string>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

using sorn::OrvoRpcV2;
using sorn::OrvoRpcWrapper;

bool FAscii(std::string_view text) {
    for (char c : text) {
        if (static_cast<unsigned char>(c) >= 0x80) return false;
    }
    return true;
}

std::string Marshalled(const ref<OrvoRpcWrapper>& message, RoxMempool* pool) {
    sorn::ByteBuffer out(pool);
    RoxString error;
    Check(OrvoRpcV2::MarshalToString(message, out, error, pool, false) && error.FEmpty(),
          "a message that was read is too large to be written");
    const std::string bytes(reinterpret_cast<const char*>(out.GetData()), out.GetLength());
    Check(OrvoRpcV2::MarshalToString(pool, message, false).View() == bytes, "the string's bytes differ");
    unsigned begin = 0;
    sorn::ByteBuffer inPlace(pool);
    Check(OrvoRpcV2::MarshalInPlace(message, inPlace, begin, error, pool) &&
              inPlace.ToRoxString(pool).View().substr(begin) == bytes,
          "the bytes in place differ");
    return bytes;
}

std::string_view ViewOf(const kelbaselib::InMemoryBytestream& stream) {
    return {reinterpret_cast<const char*>(stream.GetData()), static_cast<size_t>(stream.GetLength())};
}

bool FBinary(OrvoRpcWrapper& message) {
    const auto fBinary = [](const ref<sorn::LazyDict>& body) {
        return body->GetRep() == sorn::LazyDict::REP_PROTOBUF;
    };
    if (auto* request = dynamic_cast<sorn::RequestWrapper*>(&message)) return fBinary(request->GetBody());
    auto* const response = dynamic_cast<sorn::ResponseWrapper*>(&message);
    return response != nullptr && fBinary(response->GetBody());
}

void CheckSink(const ref<OrvoRpcWrapper>& message, const std::string& bytes, RoxMempool* pool) {
    kelbaselib::InMemoryBytestream sink(pool);
    RoxString error;
    Check(OrvoRpcV2::MarshalToBytesink(message, sink, error, pool, false) && error.FEmpty(),
          "no bytes at a sink");
    kelbaselib::InMemoryBytestream body(pool);
    message->BodyToJsonByteSink(body, false);
    const size_t begin = bytes.find("\r\n") + 2;
    const std::string headers =
        bytes.substr(begin, bytes.size() - begin - message->BodyToJson(false).NByte());
    const std::string expected = "ORPC/2 " + std::to_string(headers.size()) + " " +
                                 std::to_string(body.GetLength()) + "\r\n" + headers +
                                 std::string(ViewOf(body));
    Check(ViewOf(sink) == expected, "a sink's bytes differ");
    Check(FBinary(*message) || expected == bytes, "a sink's text differs");
}

void CheckStable(const ref<OrvoRpcWrapper>& message, RoxMempool* pool) {
    const std::string bytes = Marshalled(message, pool);
    CheckSink(message, bytes, pool);
    const size_t bodyLength = message->BodyToJson(false).NByte();
    // A header block with characters of several bytes is written and not read.
    if (!FAscii(std::string_view(bytes).substr(0, bytes.size() - bodyLength))) return;
    RoxString error;
    const RoxString text = RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(bytes.size()), bytes.data());
    const ref<OrvoRpcWrapper> again = OrvoRpcV2::UnmarshalFromString(pool, text, false, error);
    Check(again != nullptr && error.FEmpty(), "what was marshalled does not unmarshal");
    Check(again->GetRpcId() == message->GetRpcId() && again->GetTypeName() == message->GetTypeName(),
          "a message changed its number or type");
    Check(Marshalled(again, pool) == bytes, "a message read back marshals to other bytes");
}

void CheckConversion(const ref<OrvoRpcWrapper>& message, RoxMempool* pool) {
    const ref<sorn::SornObject> record = OrvoRpcV2::OrvoRpcV2ToV1(pool, message);
    Check(record != nullptr, "no record of a message");
    const ref<OrvoRpcWrapper> back = OrvoRpcV2::OrvoRpcV1ToV2Wrapper(pool, record);
    Check(back != nullptr && back->GetRpcId() == message->GetRpcId(), "a message is lost in its record");
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const RoxString text = RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(size), data);
    RoxString words;
    const ref<OrvoRpcWrapper> message = OrvoRpcV2::UnmarshalFromString(pool.Get(), text, false, words);
    RoxString bytesWords;
    const ref<OrvoRpcWrapper> ofBytes = OrvoRpcV2::UnmarshalFromBytes(
        pool.Get(), rox::ByteBuffer::New(pool.Get(), data, static_cast<uint32_t>(size)), false, bytesWords);
    Check((ofBytes == nullptr) == (message == nullptr) && bytesWords == words,
          "bytes are read otherwise than text");
    RoxString parsedWords;
    const ref<OrvoRpcWrapper> parsed = OrvoRpcV2::UnmarshalFromString(pool.Get(), text, true, parsedWords);
    const bool isShort = size <= 25 && text.View().find("\r\n") == std::string_view::npos;
    Check((message != nullptr) == (words.FEmpty() && !isShort), "a verdict and its words differ");
    Check((parsed != nullptr) == (parsedWords.FEmpty() && !isShort), "a verdict and its words differ");
    Check(message != nullptr || parsed == nullptr, "a message is refused only when its body is not read");
    if (message != nullptr) {
        CheckStable(message, pool.Get());
        CheckConversion(message, pool.Get());
        message->ToString(pool.Get());
    }
    if (parsed != nullptr) CheckStable(parsed, pool.Get());
    if (auto* response = dynamic_cast<sorn::ResponseWrapper*>(message.get()))
        response->UnmarshalToSornObject();
    return 0;
}
