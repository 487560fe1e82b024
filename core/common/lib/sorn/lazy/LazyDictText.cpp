#include <algorithm>

#include "kelbaselib/Bytesink.h"
#include "rox/RoxFeatures.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace sorn {

namespace {

/// The most that a sink gets at once of a typed writer's text.
constexpr unsigned maxPieceG = 16384;

/// A short write goes on with the rest; a write of 0 ends the transfer.
void WriteInPieces(const ByteBuffer& text, kelbaselib::Bytesink& out) {
    unsigned nWritten = 0;
    while (nWritten < text.GetLength()) {
        const unsigned nPiece = std::min(text.GetLength() - nWritten, maxPieceG);
        const unsigned nTaken = out.Write(text.GetData() + nWritten, nPiece);
        if (nTaken == 0) return;
        nWritten += std::min(nTaken, nPiece);
    }
}

}  // namespace

LazyBodyContent LazyDict::ToWrite(bool pretty, bool isForSink) const {
    LazyBodyContent content;
    content.version = versionM;
    const bool isTyped = !pretty && (!isForSink || RoxFeatures::FEnabled(VK_FEATURE_TYPED_JSON));
    if (repM == REP_JSON && !pretty) {
        content.text = bytesM;
    } else if (repM == REP_OBJECT && isTyped) {
        content.object = objectM;
    } else if (repM == REP_PROTOBUF && isTyped) {
        content.object = Decode();
    } else {
        RoxString error;  // goes nowhere
        content.dictionary = ToDictionary(error);
    }
    return content;
}

void LazyDict::ToJsonByteBuffer(ByteBuffer& out, bool pretty) const {
    const LazyBodyContent content = ToWrite(pretty, false);
    if (content.dictionary != nullptr) {
        content.dictionary->ToJson(out, JsonFormat(pretty));
    } else if (content.object != nullptr) {
        JsonSornObject(GetMempool()).SornObjectToJson(content.object.get(), content.version, out);
    } else if (content.text != nullptr) {
        out.AppendBytes(content.text->GetData(), content.text->GetLength());
    }
}

void LazyDict::ToJsonBytesink(kelbaselib::Bytesink& out, bool pretty) const {
    if (repM == REP_JSON && !pretty) {
        if (bytesM != nullptr) out.Write(bytesM->GetData(), bytesM->GetLength());
        return;
    }
    const bool isObject = repM == REP_OBJECT || repM == REP_PROTOBUF;
    if (isObject && !pretty && RoxFeatures::FEnabled(VK_FEATURE_TYPED_JSON)) {
        ByteBuffer text(GetMempool());
        ToJsonByteBuffer(text, false);
        WriteInPieces(text, out);
        return;
    }
    RoxString error;  // an unreadable body writes nothing
    const ref<Dictionary> dictionary = ToDictionary(error);
    if (dictionary != nullptr) dictionary->ToJson(out, JsonFormat(pretty));
}

ref<rox::ByteBuffer> LazyDict::ToJsonBytestring(bool pretty) const {
    if (repM == REP_JSON && !pretty && bytesM != nullptr) return bytesM;
    ByteBuffer text(GetMempool());
    ToJsonByteBuffer(text, pretty);
    return rox::ByteBuffer::New(GetMempool(), text.GetData(), text.GetLength());
}

RoxString LazyDict::ToJson(bool pretty) const {
    const ref<rox::ByteBuffer> text = ToJsonBytestring(pretty);
    return RoxString::FromUtf8Bytes(GetMempool(), text->GetLength(), text->GetData());
}

}  // namespace sorn
