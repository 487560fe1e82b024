#include <string_view>

#include "rox/RoxUtf8.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/FirstLine.h"
#include "sorn/rpc/HeaderBlock.h"
#include "sorn/rpc/OptionalHeaders.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ReservedHeaders.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorn {

namespace {

bool FAscii(std::string_view text) {
    unsigned char all = 0;
    for (char c : text) all |= static_cast<unsigned char>(c);
    return all < 0x80;
}

/// The place n characters, not bytes, behind another, the end at most: lengths in a message are bytes but
/// are looked for as characters, so that text of several bytes to a character fails the check of sizes unless
/// it is the last of the message.
uint32_t SpanEnd(std::string_view text, uint32_t begin, uint32_t n) {
    const std::string_view rest = text.substr(begin);
    if (rest.size() <= n) return static_cast<uint32_t>(text.size());
    if (FAscii(rest.substr(0, n))) return begin + n;
    const auto* const bytes = reinterpret_cast<const unsigned char*>(rest.data());
    size_t end = 0;
    for (; n != 0 && end < rest.size(); --n) end += RoxUtf8CharacterLength(bytes + end, rest.size() - end);
    return begin + static_cast<uint32_t>(end);
}

/// What a message is read from.
class Input {
 public:
    std::string_view View() const { return viewM; }
    /// Some of the bytes, for a body in the pool; not copied where they live long enough.
    virtual ref<rox::ByteBuffer> Part(RoxMempool* pool, uint32_t offset, uint32_t n) const = 0;

 protected:
    explicit Input(std::string_view view) : viewM(view) {}
    ~Input() = default;

    std::string_view viewM;
};

class TextInput final : public Input {
 public:
    explicit TextInput(const RoxString& text) : Input(text.View()), textM(text) {}
    ref<rox::ByteBuffer> Part(RoxMempool* pool, uint32_t offset, uint32_t n) const override {
        const RoxMempool* const own = textM.GetMempool();
        const bool isShared = own == nullptr || own == pool;  // otherwise the text may die before the body
        return isShared ? rox::ByteBuffer::NewOfText(pool, textM, offset, n)
                        : rox::ByteBuffer::New(pool, viewM.data() + offset, n);
    }

 private:
    const RoxString& textM;
};

class BytesInput final : public Input {
 public:
    explicit BytesInput(const ref<rox::ByteBuffer>& bytes)
        : Input({reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength()}), bytesM(bytes) {}
    ref<rox::ByteBuffer> Part(RoxMempool* pool, uint32_t offset, uint32_t n) const override {
        return rox::ByteBuffer::NewSlice(pool, bytesM, offset, n);
    }

 private:
    const ref<rox::ByteBuffer>& bytesM;
};

/// Reads one message; a step that fails leaves words.
class MessageReader {
 public:
    MessageReader(RoxMempool* pool, const Input& input, bool parseBody, RoxString& error)
        : poolM(pool), inputM(input), isBodyParsedM(parseBody), errorM(error), headersM(pool) {}

    ref<OrvoRpcWrapper> Read();

 private:
    bool Split();
    bool ReadCommonHeaders();
    bool MakeBody();
    ref<OrvoRpcWrapper> MakeRequest();
    ref<OrvoRpcWrapper> MakeUpdate();
    ref<OrvoRpcWrapper> MakeResponse();
    ref<OrvoRpcWrapper> MakeCancel();
    RoxString Header(std::string_view name) const { return HeaderBlock::ToText(poolM, headersM.Get(name)); }
    uint32_t Number(std::string_view name) const { return Dict::ParseU32(poolM, Header(name).Utf8()); }
    bool Fail(const char* words) {
        errorM = words;
        return false;
    }

    RoxMempool* poolM;
    const Input& inputM;
    bool isBodyParsedM;
    RoxString& errorM;
    HeaderBlock headersM;
    uint32_t bodyBeginM = 0;
    uint32_t bodyLengthM = 0;
    uint32_t rpcIdM = 0;
    OrvoVersion versionM;
    RoxString contentTypeM;
    ref<LazyDict> bodyM;
};

bool MessageReader::Split() {
    const std::string_view input = inputM.View();
    FirstLine line;
    if (!line.Parse(input, errorM)) return false;
    const uint32_t headerBegin = SpanEnd(input, 0, line.length);
    bodyBeginM = SpanEnd(input, headerBegin, line.headerLength);
    if (bodyBeginM - headerBegin != line.headerLength) {
        errorM.FormatAndSet("Size of header (%d) does not match expected (%d)",
                            static_cast<int>(bodyBeginM - headerBegin), static_cast<int>(line.headerLength));
        return false;
    }
    bodyLengthM = SpanEnd(input, bodyBeginM, line.bodyLength) - bodyBeginM;
    if (bodyLengthM != line.bodyLength) {
        errorM.FormatAndSet("Size of body (%d) does not match expected (%d)", static_cast<int>(bodyLengthM),
                            static_cast<int>(line.bodyLength));
        return false;
    }
    return headersM.Read(input.substr(headerBegin, line.headerLength), errorM);
}

bool MessageReader::ReadCommonHeaders() {
    if (!headersM.FHas(header::rpcIdG)) return Fail("Missing rpcId");
    const std::string_view contentType = headersM.Get(header::contentTypeG);
    if (contentType == header::applicationJsonG) {
        contentTypeM = ApplicationJson();
    } else if (!contentType.empty()) {
        errorM.FormatAndSet("Unsupported Content-Type: '%s'", Header(header::contentTypeG).Utf8());
        return false;
    }
    // No number counts as 0 and is no failure.
    rpcIdM = Number(header::rpcIdG);
    versionM = static_cast<int>(Number(header::schemaVersionG));
    return true;
}

bool MessageReader::MakeBody() {
    if (bodyLengthM == 0) return Fail("Missing message body");
    if (isBodyParsedM) {
        RoxString words;
        const ref<Dictionary> dictionary = Dictionary::FromJson(
            RoxString::FromUtf8Bytes(poolM, bodyLengthM, inputM.View().data() + bodyBeginM), words, poolM);
        if (dictionary == nullptr) {
            errorM.FormatAndSet("Cannot convert JSON to Dict: %s", words.Utf8());
            return false;
        }
        bodyM = LazyDict::FromDictionary(poolM, dictionary, versionM);
        return true;
    }
    bodyM = LazyDict::FromBytestring(poolM, inputM.Part(poolM, bodyBeginM, bodyLengthM), versionM);
    // A text that opens with a NUL is none.
    return bodyM != nullptr || Fail("Missing message body");
}

ref<OrvoRpcWrapper> MessageReader::MakeRequest() {
    if (!headersM.FHas(header::responseCountG)) {
        Fail("Missing ResponseCount in request");
        return nullptr;
    }
    RequestWrapper::ResponseCount count;
    if (!RequestWrapper::ParseResponseCount(headersM.Get(header::responseCountG), count)) {
        Fail("Invalid value for ResponseCount header");
        return nullptr;
    }
    if (!headersM.FHas(header::requestTypeG)) {
        Fail("Missing RequestType in request");
        return nullptr;
    }
    if (!MakeBody()) return nullptr;
    ref<RequestWrapper> request =
        RequestWrapper::New(poolM, rpcIdM, Header(header::requestTypeG), count, versionM, bodyM,
                            headersM.ToDict(poolM, RequestWrapper::FReserved));
    request->SetContentType(contentTypeM);
    return request;
}

ref<OrvoRpcWrapper> MessageReader::MakeUpdate() {
    if (!headersM.FHas(header::requestTypeG)) {
        Fail("Missing RequestType header.");
        return nullptr;
    }
    if (!MakeBody()) return nullptr;
    ref<RequestUpdateWrapper> update =
        RequestUpdateWrapper::New(poolM, rpcIdM, Header(header::requestTypeG), bodyM,
                                  headersM.ToDict(poolM, RequestUpdateWrapper::FReserved));
    update->SetContentType(contentTypeM);
    return update;
}

ref<OrvoRpcWrapper> MessageReader::MakeResponse() {
    if (!MakeBody()) return nullptr;
    ref<ResponseWrapper> response =
        ResponseWrapper::New(poolM, rpcIdM, headersM.Get(header::isFinalG) == "true", bodyM,
                             headersM.ToDict(poolM, ResponseWrapper::FReserved));
    response->SetContentType(contentTypeM);
    return response;
}

ref<OrvoRpcWrapper> MessageReader::MakeCancel() {
    if (bodyLengthM != 0) {
        Fail("'cancel' should not have a body");
        return nullptr;
    }
    return CancelWrapper::New(poolM, rpcIdM, nullptr);
}

ref<OrvoRpcWrapper> MessageReader::Read() {
    if (!Split() || !ReadCommonHeaders()) return nullptr;
    const std::string_view type = headersM.Get(header::typeG);
    if (type == "request") return MakeRequest();
    if (type == "requestUpdate") return MakeUpdate();
    if (type == "response") return MakeResponse();
    if (type == "cancel") return MakeCancel();
    if (type.empty()) {
        Fail("Missing 'Type' header");
    } else {
        errorM.FormatAndSet("Error in unmarshalling : Unknown Type: %s", Header(header::typeG).Utf8());
    }
    return nullptr;
}

}  // namespace

ref<OrvoRpcWrapper> OrvoRpcV2::UnmarshalFromString(RoxMempool* pool, const RoxString& input, bool parseBody,
                                                   RoxString& error) {
    return MessageReader(pool, TextInput(input), parseBody, error).Read();
}

ref<OrvoRpcWrapper> OrvoRpcV2::UnmarshalFromBytes(RoxMempool* pool, const ref<rox::ByteBuffer>& input,
                                                  bool parseBody, RoxString& error) {
    return MessageReader(pool, BytesInput(input), parseBody, error).Read();
}

}  // namespace sorn
