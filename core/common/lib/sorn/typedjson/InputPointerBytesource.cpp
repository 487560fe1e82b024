#include "sorn/typedjson/InputPointerBytesource.h"

#include <algorithm>

#include "kelbaselib/InMemoryBytesource.h"
#include "kelbaselib/InMemoryBytestream.h"

namespace sorn {

InputPointerBytesource::InputPointerBytesource(const unsigned char* data, unsigned length)
    : pSourceM(nullptr), pCurrentM(data), pEndM(data + length), lastReadLengthM(length), canRefillM(false) {}

InputPointerBytesource::InputPointerBytesource(kelbaselib::Bytesource* source)
    : pSourceM(source), pCurrentM(bufferM), pEndM(bufferM), lastReadLengthM(0), canRefillM(true) {}

InputPointerBytesource::InputPointerBytesource(kelbaselib::InMemoryBytesource& source)
    : InputPointerBytesource(source.GetData(), source.GetAvailable()) {
    pMemorySourceM = &source;
    pMemoryM = pCurrentM;
}

InputPointerBytesource InputPointerBytesource::Over(kelbaselib::Bytesource* source) {
    auto* const inMemory = dynamic_cast<kelbaselib::InMemoryBytesource*>(source);
    if (inMemory != nullptr) return InputPointerBytesource(*inMemory);
    return InputPointerBytesource(source);
}

bool InputPointerBytesource::Refill() {
    if (isCapturingM) CopyToSink();
    if (!canRefillM) return false;
    consumedLengthM += lastReadLengthM;
    const unsigned given = pSourceM != nullptr ? pSourceM->Read(bufferM, blockBytesG) : 0;
    lastReadLengthM = std::min(given, blockBytesG);
    pCurrentM = bufferM;
    pCaptureStartM = bufferM;
    pEndM = bufferM + lastReadLengthM;
    return lastReadLengthM != 0;
}

bool InputPointerBytesource::SkipInNextBlocks() {
    while (Refill()) {
        pCurrentM = textscan::SkipWhitespace(pCurrentM, pEndM);
        if (pCurrentM != pEndM) return true;
    }
    return false;
}

uint32_t InputPointerBytesource::TakenInBlocks() const {
    const uint64_t nPassed = static_cast<uint64_t>(pCurrentM - pMemoryM);
    const uint64_t nBlocks = (nPassed + blockBytesG - 1) / blockBytesG;
    return static_cast<uint32_t>(std::min(nBlocks * blockBytesG, static_cast<uint64_t>(pEndM - pMemoryM)));
}

bool InputPointerBytesource::FAtEndOfBlock() const {
    return pMemorySourceM != nullptr && static_cast<size_t>(pCurrentM - pMemoryM) % blockBytesG == 0;
}

void InputPointerBytesource::CopyToSink() {
    if (pCaptureSinkM == nullptr) pCaptureSinkM = new kelbaselib::InMemoryBytestream(pCapturePoolM);
    pCaptureSinkM->Write(pCaptureStartM, static_cast<unsigned>(pCurrentM - pCaptureStartM));
    pCaptureStartM = pCurrentM;
}

void InputPointerBytesource::StartCapture(RoxMempool* pool) {
    isCapturingM = true;
    pCaptureStartM = pCurrentM;
    pCapturePoolM = pool;
}

/// A range keeps the whole storage alive, so that only large parts of it are worth that; and bytes in another
/// pool than the capture's would go with that pool.
bool InputPointerBytesource::FShares() const {
    constexpr uint64_t worthG = 4;
    if (pMemorySourceM == nullptr) return false;
    const kelbaselib::InMemoryStorage& storage = pMemorySourceM->GetStorage();
    const uint64_t nCaptured = static_cast<uint64_t>(pCurrentM - pCaptureStartM);
    return storage.GetMempool() == pCapturePoolM && nCaptured >= storage.GetLength() / worthG;
}

kelbaselib::Bytesource* InputPointerBytesource::FinishCapture() {
    isCapturingM = false;
    if (FShares()) {
        return pMemorySourceM->NewRange(static_cast<unsigned>(pCaptureStartM - pMemoryM),
                                        static_cast<unsigned>(pCurrentM - pMemoryM));
    }
    CopyToSink();
    kelbaselib::InMemoryBytestream* const stream = pCaptureSinkM;
    pCaptureSinkM = nullptr;
    return stream;
}

void InputPointerBytesource::DropCapture() {
    isCapturingM = false;
    if (pCaptureSinkM != nullptr) pCaptureSinkM->Release();
    pCaptureSinkM = nullptr;
}

}  // namespace sorn
