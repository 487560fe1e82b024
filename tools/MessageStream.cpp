#include "tools/MessageStream.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <utility>

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

MessageStream::MessageStream(int descriptor, std::function<void()> willWait)
    : descriptorM(descriptor), willWaitM(std::move(willWait)), packetizerM(nullptr) {}

MessageStream::Piece MessageStream::Next(RoxString& bytes, RoxString& words) {
    packetizerM.Reset();
    packetizerM.lastError = RoxString();
    offsetM = takenM;
    for (;;) {
        if (FBadFirstLine()) {
            words = packetizerM.lastError;
            SkipJunk();
            return JUNK;
        }
        const size_t available = bufferM.size() - beginM;
        if (packetizerM.firstLineParsed && available >= packetizerM.packetLength) {
            bytes = ToText(bufferM.data() + beginM, packetizerM.packetLength);
            Skip(packetizerM.packetLength);
            return MESSAGE;
        }
        switch (Fill()) {
            case SOME:
                break;
            case NONE:
                Skip(available);
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

/// Nothing of it is kept but what may be the front of a first line: junk may be of any length.
void MessageStream::SkipJunk() {
    Skip(1);
    size_t next = 0;
    while ((next = bufferM.find(magicG, beginM)) == std::string::npos) {
        const size_t available = bufferM.size() - beginM;
        Skip(available - std::min(available, sizeof magicG - 2));
        if (Fill() == SOME) continue;
        next = bufferM.size();
        break;
    }
    Skip(next - beginM);
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

void MessageStream::Skip(size_t n) {
    beginM += n;
    takenM += n;
}

}  // namespace sorn::tools
