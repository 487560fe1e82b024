#include "tools/MessageStream.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>

namespace sorn::tools {

namespace {

constexpr size_t pieceBytesG = 64 * 1024;
/// What is looked at for a first line; one that ends later is bad.
constexpr size_t maxFirstLineG = 4096;
constexpr char magicG[] = "ORPC/2 ";

RoxString ToText(const char* bytes, size_t n) {
    return RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(n), bytes);
}

}  // namespace

MessageStream::MessageStream(int descriptor, void (*willWait)())
    : descriptorM(descriptor), willWaitM(willWait), packetizerM(nullptr) {}

MessageStream::Piece MessageStream::Next(RoxString& bytes, RoxString& words) {
    packetizerM.Reset();
    packetizerM.lastError = RoxString();
    offsetM = takenM;
    for (;;) {
        if (FBadFirstLine()) return TakeJunk(bytes, words);
        const size_t available = bufferM.size() - beginM;
        if (packetizerM.firstLineParsed && available >= packetizerM.packetLength) {
            Take(packetizerM.packetLength, bytes);
            return MESSAGE;
        }
        switch (Fill()) {
            case SOME:
                break;
            case NONE:
                Take(available, bytes);
                return available == 0 ? END : UNFINISHED;
            case ERROR:
                return FAILED;
        }
    }
}

bool MessageStream::FBadFirstLine() {
    if (packetizerM.firstLineParsed) return false;
    packetizerM.UpdateInput(
        ToText(bufferM.data() + beginM, std::min(bufferM.size() - beginM, maxFirstLineG)));
    return !packetizerM.lastError.FEmpty();
}

MessageStream::Piece MessageStream::TakeJunk(RoxString& bytes, RoxString& words) {
    words = packetizerM.lastError;
    size_t next = 0;
    size_t looked = beginM + 1;
    while ((next = bufferM.find(magicG, looked)) == std::string::npos) {
        const size_t tail = std::min(bufferM.size() - beginM, sizeof magicG - 2);  // may be the front of one
        looked = std::max(beginM + 1, bufferM.size() - tail);
        const size_t begin = beginM;
        const Filled filled = Fill();
        looked -= begin - beginM;
        if (filled == SOME) continue;
        next = bufferM.size();
        break;
    }
    Take(next - beginM, bytes);
    return JUNK;
}

MessageStream::Filled MessageStream::Fill() {
    bufferM.erase(0, beginM);
    beginM = 0;
    willWaitM();
    const size_t size = bufferM.size();
    bufferM.resize(size + pieceBytesG);
    ssize_t n = 0;
    do {
        n = ::read(descriptorM, bufferM.data() + size, pieceBytesG);
    } while (n < 0 && errno == EINTR);
    bufferM.resize(size + static_cast<size_t>(std::max<ssize_t>(n, 0)));
    return n > 0 ? SOME : n == 0 ? NONE : ERROR;
}

void MessageStream::Take(size_t n, RoxString& bytes) {
    bytes = ToText(bufferM.data() + beginM, n);
    beginM += n;
    takenM += n;
}

}  // namespace sorn::tools
