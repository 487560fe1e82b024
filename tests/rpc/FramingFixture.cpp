#include "rpc/FramingFixture.h"

#include "rox/RoxStringArray.h"
#include "rpc/ModelText.h"
#include "rpc/ModelWriter.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorntest {

using namespace sorn;

namespace {

std::string TextOfBody(const LazyDict& body) {
    if (body.GetStoredBytes() == nullptr) return std::string(body.ToJson(false).View());
    const rox::ByteBuffer& bytes = *body.GetStoredBytes();
    return std::string(reinterpret_cast<const char*>(bytes.GetData()), bytes.GetLength());
}

ModelHeaders HeadersOf(const Dict& dict) {
    ModelHeaders headers;
    RoxStringArray names;
    dict.GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        std::vector<std::string>& vValues = headers[std::string(names[i].View())];
        for (unsigned n = 0; n < dict.CountValues(names[i]); ++n) {
            vValues.emplace_back(dict.GetString(names[i], n).View());
        }
    }
    return headers;
}

template <class Wrapper>
void LookIntoBody(const Wrapper& wrapper, ModelMessage& message) {
    message.contentType = std::string(wrapper.GetContentType().View());
    message.optional = HeadersOf(*wrapper.GetOptionalHeaders());
    message.bodyVersion = static_cast<uint32_t>(wrapper.GetBody()->GetVersion().Number());
    message.body = TextOfBody(*wrapper.GetBody());
}

}  // namespace

std::string FramingFixture::Str(const rox::ByteBuffer& bytes) {
    if (bytes.FEmpty()) return std::string();
    return std::string(reinterpret_cast<const char*>(bytes.GetData()), bytes.GetLength());
}

ref<rox::ByteBuffer> FramingFixture::Bytes(const std::string& text) {
    return rox::ByteBuffer::New(&pool, text.data(), static_cast<uint32_t>(text.size()));
}

ref<Dict> FramingFixture::DictOf(const ModelHeaders& headers) {
    ref<Dict> dict = MakeDict(&pool);
    for (const auto& [name, vValues] : headers) {
        for (const std::string& value : vValues) dict->AddString(Text(name), Text(value));
    }
    return dict;
}

ref<LazyDict> FramingFixture::BodyOf(const std::string& json, int version) {
    return LazyDict::FromJsonString(&pool, Text(json), version);
}

ref<OrvoRpcWrapper> FramingFixture::Wrap(const ModelMessage& message) {
    if (message.kind == "cancel") return CancelWrapper::New(&pool, message.rpcId, nullptr);
    const ref<LazyDict> body = BodyOf(message.body, static_cast<int>(message.bodyVersion));
    const ref<Dict> headers = DictOf(message.optional);
    if (message.kind == "response") {
        ref<ResponseWrapper> response =
            ResponseWrapper::New(&pool, message.rpcId, message.isFinal, body, headers);
        response->SetContentType(Text(message.contentType));
        return response;
    }
    const RoxString type = Text(message.requestType);
    if (message.kind == "requestUpdate") {
        return RequestUpdateWrapper::New(&pool, message.rpcId, type, body, headers);
    }
    const auto count = message.responseCount == "none"     ? RequestWrapper::RESPONSE_COUNT_NONE
                       : message.responseCount == "single" ? RequestWrapper::RESPONSE_COUNT_SINGLE
                                                           : RequestWrapper::RESPONSE_COUNT_MULTIPLE;
    return RequestWrapper::New(&pool, message.rpcId, type, count, static_cast<int>(message.version), body,
                               headers);
}

ModelMessage FramingFixture::Look(OrvoRpcWrapper& wrapper) {
    ModelMessage message;
    message.rpcId = wrapper.GetRpcId();
    message.version = static_cast<uint32_t>(wrapper.GetOrvoVersion().Number());
    if (auto* const response = dynamic_cast<ResponseWrapper*>(&wrapper)) {
        message.kind = "response";
        message.isFinal = response->IsFinalResponse();
        LookIntoBody(*response, message);
    } else if (auto* const request = dynamic_cast<RequestWrapper*>(&wrapper)) {
        message.kind = dynamic_cast<RequestUpdateWrapper*>(&wrapper) != nullptr ? "requestUpdate" : "request";
        message.requestType = Str(request->GetRequestType());
        message.responseCount = RequestWrapper::ResponseCountWord(request->GetResponseCount());
        LookIntoBody(*request, message);
    } else {
        message.kind = dynamic_cast<CancelWrapper*>(&wrapper) != nullptr ? "cancel" : "of no kind";
    }
    return message;
}

std::string FramingFixture::Written(const ref<OrvoRpcWrapper>& wrapper, const char* wordsBefore) {
    ByteBuffer out(&pool);
    RoxString error(wordsBefore);
    const bool isWritten = OrvoRpcV2::MarshalToString(wrapper, out, error, &pool, false);
    const std::string bytes(reinterpret_cast<const char*>(out.GetData()), out.GetLength());
    ByteBuffer inPlace(&pool);
    inPlace.AppendString("what was there before");
    unsigned begin = 0;
    RoxString errorInPlace(wordsBefore);
    EXPECT_EQ(OrvoRpcV2::MarshalInPlace(wrapper, inPlace, begin, errorInPlace, &pool), isWritten);
    EXPECT_EQ(Str(errorInPlace), Str(error));
    if (isWritten) {
        EXPECT_EQ(Str(inPlace.ToRoxString(&pool)).substr(begin), bytes);
        EXPECT_EQ(Str(error), wordsBefore);
        return bytes;
    }
    EXPECT_EQ(bytes, "");
    return Str(error);
}

std::string FramingFixture::ByLibrary(const std::string& input, bool isBodyParsed, const char* wordsBefore) {
    RoxString error(wordsBefore);
    const RoxString text = Text(input);
    const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(&pool, text, isBodyParsed, error);
    RoxString errorOfBytes(wordsBefore);
    const ref<OrvoRpcWrapper> ofBytes =
        OrvoRpcV2::UnmarshalFromBytes(&pool, Bytes(input), isBodyParsed, errorOfBytes);
    EXPECT_EQ(Str(errorOfBytes), Str(error));
    EXPECT_EQ(ofBytes == nullptr, wrapper == nullptr);
    if (wrapper == nullptr) return "refused: " + Str(error);
    EXPECT_EQ(Str(error), wordsBefore);
    EXPECT_EQ(Look(*ofBytes).Describe(), Look(*wrapper).Describe());
    return "read: " + Look(*wrapper).Describe();
}

std::string FramingFixture::ByModel(const std::string& input, bool isBodyParsed, const char* wordsBefore) {
    std::string compact;
    const auto isJson = [&](const std::string& body, std::string& words) {
        RoxString detail;
        const ref<Dictionary> dictionary = Dictionary::FromJson(Text(body), detail, &pool);
        words = ModelPrinted(Str(detail));
        if (dictionary != nullptr) compact = Str(dictionary->ToJson(false));
        return dictionary != nullptr;
    };
    ModelReader reader(isBodyParsed ? ModelReader::IsJson(isJson) : nullptr);
    ModelMessage message;
    std::string error = wordsBefore;
    if (!reader.Read(input, message, error)) return "refused: " + error;
    EXPECT_EQ(error, wordsBefore);
    if (isBodyParsed && message.kind != "cancel") message.body = compact;
    return "read: " + message.Describe();
}

std::string Framed(const std::vector<std::string>& vLines, const std::string& body) {
    std::string block;
    for (const std::string& line : vLines) block += line + "\r\n";
    return ModelWriter::Frame(block + "\r\n", body);
}

}  // namespace sorntest
