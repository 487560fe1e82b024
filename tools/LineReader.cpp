#include "tools/LineReader.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace sorn::tools {

namespace {

constexpr size_t pieceBytesG = 65536;

}  // namespace

LineReader::LineReader(int descriptor) : descriptorM(descriptor), vPieceM(pieceBytesG) {}

bool LineReader::FLineReady() const {
    return endM > nextM && std::memchr(vPieceM.data() + nextM, '\n', endM - nextM) != nullptr;
}

bool LineReader::Refill() {
    if (fFailedM) return false;
    ssize_t n = 0;
    do {
        n = ::read(descriptorM, vPieceM.data(), vPieceM.size());
    } while (n < 0 && errno == EINTR);
    fFailedM = n < 0;
    if (fFailedM) errorM = errno;
    nextM = 0;
    endM = fFailedM ? 0 : static_cast<size_t>(n);
    return endM != 0;
}

std::string LineReader::FailureWords() const {
    return errorM != 0 ? std::strerror(errorM) : "a record is 4 GiB or longer";
}

bool LineReader::Take(size_t n, std::string& text) {
    fFailedM = n > maxRecordBytesG - text.size();
    if (fFailedM) return false;
    text.append(vPieceM.data() + nextM, n);
    nextM += n;
    return true;
}

bool LineReader::ReadLine(std::string& line) {
    line.clear();
    bool fAny = false;
    while (nextM < endM || Refill()) {
        fAny = true;
        const char* const start = vPieceM.data() + nextM;
        const void* const feed = std::memchr(start, '\n', endM - nextM);
        if (feed == nullptr) {
            if (!Take(endM - nextM, line)) return false;
            continue;
        }
        if (!Take(static_cast<size_t>(static_cast<const char*>(feed) - start), line)) return false;
        ++nextM;
        return true;
    }
    return fAny && !fFailedM;
}

bool LineReader::ReadAll(std::string& text) {
    text.clear();
    while (nextM < endM || Refill()) {
        if (!Take(endM - nextM, text)) return false;
    }
    return !fFailedM;
}

}  // namespace sorn::tools
