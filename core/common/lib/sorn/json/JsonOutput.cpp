#include "sorn/json/JsonOutput.h"

#include <algorithm>
#include <utility>

#include "kelbaselib/Bytesink.h"
#include "rox/RoxAssert.h"
#include "sorn/dict/ByteBuffer.h"

namespace sorn {

void JsonOutput::Bytes(const void* bytes, size_t n) {
    const unsigned char* p = static_cast<const unsigned char*>(bytes);
    while (n > 0) {
        const size_t piece = std::min<size_t>(n, maxRoomG);
        std::memcpy(Room(static_cast<unsigned>(piece)), p, piece);
        pNextM += piece;
        p += piece;
        n -= piece;
    }
}

void JsonOutput::Blanks(size_t n) {
    while (n > 0) {
        const size_t piece = std::min<size_t>(n, maxRoomG);
        std::memset(Room(static_cast<unsigned>(piece)), ' ', piece);
        pNextM += piece;
        n -= piece;
    }
}

JsonBufferOutput::JsonBufferOutput(ByteBuffer& buffer) : bufferM(buffer) {
    pBeginM = pNextM = firstM;
    pEndM = firstM + sizeof firstM;
}

void JsonBufferOutput::Close() {
    const auto n = static_cast<unsigned>(pNextM - pBeginM);
    if (pBeginM == firstM) {
        bufferM.AppendBytes(firstM, n);
    } else {
        bufferM.Commit(n);
    }
}

void JsonBufferOutput::NextWindow(unsigned n) {
    constexpr unsigned largestWindow = 1u << 28;
    unsigned nFirst = 0;
    if (pBeginM == firstM) {
        nFirst = static_cast<unsigned>(pNextM - firstM);
    } else {
        Close();
    }
    const unsigned length = bufferM.GetLength() + nFirst;
    const unsigned capacity = bufferM.GetCapacity();
    // The buffer keeps its capacity a byte ahead of its data.
    unsigned window = capacity > length ? capacity - length - 1 : 0;
    if (window < n) {
        // As much again as stands there, so that a long text is moved few times.
        window = std::max(n, std::min(length, largestWindow));
        if (window > (~0u - length) / 2) window = n;
    }
    pBeginM = bufferM.Reserve(nFirst + window);
    pEndM = pBeginM + nFirst + window;
    pNextM = pBeginM + nFirst;
    if (nFirst != 0) std::memcpy(pBeginM, firstM, nFirst);
}

JsonTextOutput::JsonTextOutput(RoxMempool* pool) : pMempoolM(pool) {
    pBeginM = pNextM = firstM;
    pEndM = firstM + sizeof firstM;
}

JsonTextOutput::~JsonTextOutput() {
    if (pLongM != nullptr) pLongM->DownRef();
}

void JsonTextOutput::NextWindow(unsigned n) {
    const size_t length = static_cast<size_t>(pNextM - pBeginM);
    RoxAssert(length + n <= UINT32_MAX, "JSON text of 4 GiB or more");
    const uint32_t capacity = static_cast<uint32_t>(std::min<size_t>(length * 2 + n, UINT32_MAX));
    if (pLongM == nullptr) {
        pLongM = RoxStringRepN::New(pMempoolM, capacity);
        std::memcpy(pLongM->MutableBytes(), firstM, length);
    } else {
        pLongM = RoxStringRepN::Resize(pLongM, capacity);
    }
    pBeginM = reinterpret_cast<unsigned char*>(pLongM->MutableBytes());
    pNextM = pBeginM + length;
    pEndM = pBeginM + capacity;
}

RoxString JsonTextOutput::Take() {
    const uint32_t length = static_cast<uint32_t>(pNextM - pBeginM);
    if (pLongM == nullptr) return RoxString::FromUtf8Bytes(pMempoolM, length, firstM);
    RoxStringRepN* const text = RoxStringRepN::Resize(std::exchange(pLongM, nullptr), length);
    pBeginM = pNextM = pEndM = nullptr;
    return RoxString::AdoptRepN(text);
}

JsonSinkOutput::JsonSinkOutput(kelbaselib::Bytesink& sink) : JsonOutput(true), sinkM(sink) {
    pBeginM = pNextM = windowM;
    pEndM = windowM + windowG;
}

void JsonSinkOutput::Flush() {
    const unsigned n = static_cast<unsigned>(pNextM - pBeginM);
    if (n != 0 && !isFullM) isFullM = sinkM.Write(windowM, n) != n;
    pNextM = pBeginM;
}

void JsonSinkOutput::NextWindow(unsigned) {
    static_assert(windowG >= maxRoomG);
    Flush();
}

}  // namespace sorn
