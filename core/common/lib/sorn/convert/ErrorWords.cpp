#include "sorn/convert/ErrorWords.h"

namespace sorn {

void ErrorWords::Begin(const char* text) {
    bufferM.emplace(pMempoolM);
    bufferM->AppendString(text);
}

void ErrorWords::Append(const char* text) {
    if (!bufferM.has_value()) Begin(targetM.Utf8());
    endsInNulM = false;
    bufferM->AppendString(text);
}

void ErrorWords::AppendRaw(unsigned char byte) {
    if (!bufferM.has_value()) Begin(targetM.Utf8());
    endsInNulM = byte == 0;
    if (byte != 0) bufferM->AppendByte(byte);
}

void ErrorWords::Replace(const char* text) {
    endsInNulM = false;
    Begin(text);
}

void ErrorWords::Commit() {
    if (!bufferM.has_value()) return;
    if (endsInNulM) bufferM->AppendByte(0);
    targetM = targetM.FromUtf8Bytes(bufferM->GetLength(), bufferM->GetData());
    bufferM.reset();
    endsInNulM = false;
}

}  // namespace sorn
