#include "tools/LineReader.h"

#include <cstring>

namespace sorn::tools {

namespace {

constexpr size_t pieceBytesG = 65536;

}  // namespace

LineReader::LineReader(std::FILE* file) : pFileM(file), vPieceM(pieceBytesG) {}

bool LineReader::Refill() {
    if (fFailedM) return false;
    nextM = 0;
    endM = std::fread(vPieceM.data(), 1, vPieceM.size(), pFileM);
    fFailedM = endM == 0 && std::ferror(pFileM) != 0;
    return endM != 0;
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
