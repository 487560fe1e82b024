#include <cstdio>
#include <cstring>
#include <string_view>
#include <typeinfo>

#include "kelbaselib/ByteCountingBytesink.h"
#include "kelbaselib/Bytesink.h"
#include "rox/RoxStringArray.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/NewText.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/FirstLine.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ReservedHeaders.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorn {

namespace {

void AppendView(ByteBuffer& out, std::string_view text) {
    out.AppendBytes(text.data(), static_cast<unsigned>(text.size()));
}

void AppendLine(ByteBuffer& out, std::string_view name, std::string_view value) {
    AppendView(out, name);
    out.AppendLiteral(": ");
    AppendView(out, value);
    out.AppendLiteral("\r\n");
}

/// What the framing asks of a message's own class, so that it neither makes a dictionary of headers nor
/// copies a body of text. A class that the library does not know goes by its virtual operations.
struct Known {
    bool isKnown = false;
    const Dict* optionalHeaders = nullptr;
    const LazyDict* body = nullptr;
};

template <class Wrapper>
const Wrapper* ExactCast(const OrvoRpcWrapper& wrapper) {
    return typeid(wrapper) == typeid(Wrapper) ? static_cast<const Wrapper*>(&wrapper) : nullptr;
}

Known Look(const OrvoRpcWrapper& wrapper, ReservedHeaders& reserved) {
    const auto ofRequest = [&reserved](const auto& request) {
        request.GetReservedHeaders(reserved);
        return Known{true, request.GetOptionalHeaders().get(), request.GetBody().get()};
    };
    if (const auto* response = ExactCast<ResponseWrapper>(wrapper)) return ofRequest(*response);
    if (const auto* request = ExactCast<RequestWrapper>(wrapper)) return ofRequest(*request);
    if (const auto* update = ExactCast<RequestUpdateWrapper>(wrapper)) return ofRequest(*update);
    if (const auto* cancel = ExactCast<CancelWrapper>(wrapper)) {
        cancel->GetReservedHeaders(reserved);
        return {true, nullptr, nullptr};
    }
    return {};
}

/// One message in the making: the header block and the body's length are checked before anything is written.
class Framing {
 public:
    Framing(OrvoRpcWrapper& wrapper, RoxString& error, RoxMempool* pool)
        : wrapperM(wrapper), errorM(error), poolM(pool), headersM(pool) {
        knownM = Look(wrapper, reservedM);
    }

    bool CheckBody(uint64_t length) {
        if (length > OrvoRpcV2::maxBodyLengthG) return Fail("Orvo Rpc message body is too large.");
        bodyLengthM = static_cast<unsigned>(length);
        return true;
    }
    /// The header block; whether it is small enough is for CheckHeaders.
    void MakeHeaders();
    bool CheckHeaders() {
        return (areHeadersWholeM && headersM.GetLength() <= OrvoRpcV2::maxHeaderLengthG) ||
               Fail("Orvo Rpc headers are too large");
    }
    /// The bytes of a body that is JSON text as it is, else null.
    const rox::ByteBuffer* GetReadyText(bool pretty) const {
        const bool isReady = knownM.body != nullptr && !pretty && knownM.body->GetRep() == LazyDict::REP_JSON;
        return isReady ? knownM.body->GetStoredBytes().get() : nullptr;
    }
    const ByteBuffer& GetHeaders() const { return headersM; }
    /// The first line, at most maxFirstLineG bytes; gives their number.
    unsigned WriteFirstLine(char* out) const {
        return static_cast<unsigned>(snprintf(out, maxFirstLineG, "%s %u %u\r\n", FirstLine::magicG,
                                              headersM.GetLength(), bodyLengthM));
    }
    bool Fail(const char* words) {
        errorM.FormatAndSet("%s%s", errorM.Utf8(), words);
        return false;
    }

    static constexpr size_t maxFirstLineG = 32;

 private:
    void AppendReserved();
    bool AppendDictionary();

    OrvoRpcWrapper& wrapperM;
    RoxString& errorM;
    RoxMempool* poolM;
    ReservedHeaders reservedM;
    Known knownM;
    ByteBuffer headersM;
    bool areHeadersWholeM = true;
    unsigned bodyLengthM = 0;
};

void Framing::AppendReserved() {
    reservedM.Sort();
    for (unsigned i = 0; i < reservedM.GetLength(); ++i) {
        AppendLine(headersM, reservedM[i].name, reservedM[i].value);
    }
}

/// False for more names than an array of them holds: the message would go without some of its headers.
bool Framing::AppendDictionary() {
    if (knownM.isKnown && knownM.optionalHeaders->CountNames() > RoxStringArray::maxCount) return false;
    const ref<Dict> headers = wrapperM.HeadersToDict(poolM);
    if (headers->CountNames() > RoxStringArray::maxCount) return false;
    RoxStringArray names(poolM);
    headers->GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        const unsigned nValues = headers->CountValues(names[i]);
        for (unsigned index = 0; index < nValues; ++index) {
            AppendLine(headersM, names[i].View(), headers->GetString(names[i], index).View());
        }
    }
    return true;
}

void Framing::MakeHeaders() {
    const bool hasReservedOnly =
        knownM.isKnown && (knownM.optionalHeaders == nullptr || knownM.optionalHeaders->CountNames() == 0);
    if (hasReservedOnly) {
        AppendReserved();
    } else {
        areHeadersWholeM = AppendDictionary();
    }
    headersM.AppendLiteral("\r\n");
}

/// Makes the message and hands its three pieces to `put(pieces)`.
template <class Put>
bool Marshal(const ref<OrvoRpcWrapper>& wrapper, RoxString& error, RoxMempool* pool, bool pretty, Put put) {
    Framing framing(*wrapper, error, pool);
    ByteBuffer scratch(pool);
    std::string_view body;
    if (const rox::ByteBuffer* text = framing.GetReadyText(pretty)) {
        body = {reinterpret_cast<const char*>(text->GetData()), text->GetLength()};
    } else {
        wrapper->BodyToJsonByteBuffer(scratch, pretty);
        body = {reinterpret_cast<const char*>(scratch.GetData()), scratch.GetLength()};
    }
    if (!framing.CheckBody(body.size())) return false;
    framing.MakeHeaders();
    if (!framing.CheckHeaders()) return false;
    char line[Framing::maxFirstLineG];
    const ByteBuffer& headers = framing.GetHeaders();
    put(std::string_view(line, framing.WriteFirstLine(line)),
        std::string_view(reinterpret_cast<const char*>(headers.GetData()), headers.GetLength()), body);
    return true;
}

}  // namespace

bool OrvoRpcV2::MarshalToString(const ref<OrvoRpcWrapper>& wrapper, ByteBuffer& out, RoxString& error,
                                RoxMempool* pool, bool pretty) {
    return Marshal(wrapper, error, pool, pretty,
                   [&out](std::string_view line, std::string_view headers, std::string_view body) {
                       AppendView(out, line);
                       AppendView(out, headers);
                       AppendView(out, body);
                   });
}

/// The body's length is known when the body stands there: then the first line is put in front.
bool OrvoRpcV2::MarshalInPlace(const ref<OrvoRpcWrapper>& wrapper, ByteBuffer& out, unsigned& begin,
                               RoxString& error, RoxMempool* pool) {
    constexpr unsigned roomG = Framing::maxFirstLineG;
    Framing framing(*wrapper, error, pool);
    const rox::ByteBuffer* const text = framing.GetReadyText(false);
    if (text != nullptr && !framing.CheckBody(text->GetLength())) return false;
    framing.MakeHeaders();
    const ByteBuffer& headers = framing.GetHeaders();
    out.Clear();
    out.Reserve(roomG);
    out.Commit(roomG);
    out.AppendBytes(headers.GetData(), headers.GetLength());
    wrapper->BodyToJsonByteBuffer(out, false);
    if (!framing.CheckBody(out.GetLength() - roomG - headers.GetLength()) || !framing.CheckHeaders()) {
        return false;
    }
    char line[roomG];
    const unsigned nLine = framing.WriteFirstLine(line);
    begin = roomG - nLine;
    out.Overwrite(begin, line, nLine);
    return true;
}

bool OrvoRpcV2::MarshalToString(const ref<OrvoRpcWrapper>& wrapper, RoxString& out, RoxString& error,
                                RoxMempool* pool, bool pretty) {
    return Marshal(wrapper, error, pool, pretty,
                   [&out, pool](std::string_view line, std::string_view headers, std::string_view body) {
                       const size_t length = line.size() + headers.size() + body.size();
                       out = NewText(pool, static_cast<uint32_t>(length), [&](char* p) {
                           p = static_cast<char*>(mempcpy(p, line.data(), line.size()));
                           p = static_cast<char*>(mempcpy(p, headers.data(), headers.size()));
                           if (!body.empty()) memcpy(p, body.data(), body.size());
                       });
                   });
}

RoxString OrvoRpcV2::MarshalToString(RoxMempool* pool, const ref<OrvoRpcWrapper>& wrapper, bool pretty) {
    RoxString out;
    RoxString error;
    MarshalToString(wrapper, out, error, pool, pretty);
    return out;
}

bool OrvoRpcV2::MarshalToBytesink(const ref<OrvoRpcWrapper>& wrapper, kelbaselib::Bytesink& out,
                                  RoxString& error, RoxMempool* pool, bool pretty) {
    Framing framing(*wrapper, error, pool);
    kelbaselib::ByteCountingBytesink counter;
    wrapper->BodyToJsonByteSink(counter, pretty);
    if (!framing.CheckBody(counter.GetWrittenBytes())) return false;
    framing.MakeHeaders();
    if (!framing.CheckHeaders()) return false;

    char line[Framing::maxFirstLineG];
    out.Write(line, framing.WriteFirstLine(line));
    const ByteBuffer& headers = framing.GetHeaders();
    // Neither this nor any other refusal of the sink makes the operation fail; its callers count on that.
    if (out.Write(headers.GetData(), headers.GetLength()) == 0) framing.Fail("Failed to write headers");
    wrapper->BodyToJsonByteSink(out, pretty);
    out.Finish();
    return true;
}

}  // namespace sorn
