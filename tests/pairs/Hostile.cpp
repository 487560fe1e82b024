#include "pairs/Hostile.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstring>

namespace sorntest {

ExactBytes::ExactBytes(const std::string& bytes)
    : pDataM(new unsigned char[bytes.size()]), lengthM(bytes.size()) {
    if (lengthM != 0) memcpy(pDataM, bytes.data(), lengthM);
}

unsigned PieceSource::Read(void* buffer, unsigned capacity) {
    size_t n = bytesM.size() - positionM;
    if (n > capacity) n = capacity;
    if (n > pieceM) n = pieceM;
    memcpy(buffer, bytesM.data() + positionM, n);
    positionM += n;
    return static_cast<unsigned>(n);
}

QuietOutput::QuietOutput() {
    fflush(stdout);
    savedM = dup(STDOUT_FILENO);
    int nowhere = open("/dev/null", O_WRONLY | O_CLOEXEC);
    dup2(nowhere, STDOUT_FILENO);
    close(nowhere);
}

QuietOutput::~QuietOutput() {
    fflush(stdout);
    dup2(savedM, STDOUT_FILENO);
    close(savedM);
}

void ForEachTruncation(const std::string& bytes, const Attack& attack) {
    for (size_t n = 0; n < bytes.size(); ++n) attack(bytes.substr(0, n));
}

void ForEachBitFlip(const std::string& bytes, const Attack& attack) {
    std::string changed = bytes;
    for (size_t i = 0; i < bytes.size() * 8; ++i) {
        char bit = static_cast<char>(1 << i % 8);
        changed[i / 8] = static_cast<char>(changed[i / 8] ^ bit);
        attack(changed);
        changed[i / 8] = bytes[i / 8];
    }
}

namespace {

std::string Varint(uint64_t number) {
    std::string out;
    for (; number >= 0x80; number >>= 7) out += static_cast<char>((number & 0x7F) | 0x80);
    return out + static_cast<char>(number);
}

}  // namespace

void ForEachWrongNumber(const std::string& bytes, const Attack& attack) {
    for (size_t i = 0; i < bytes.size(); ++i) {
        uint64_t number = 0;
        size_t n = 0;
        bool isMore = true;
        while (isMore && i + n < bytes.size() && n < 10) {
            unsigned char c = static_cast<unsigned char>(bytes[i + n]);
            number |= uint64_t{c & 0x7Fu} << 7 * n;
            isMore = c >= 0x80;
            ++n;
        }
        for (uint64_t wrong :
             {uint64_t{0}, number - 1, number + 1, uint64_t{1} << 31, uint64_t{UINT32_MAX}, UINT64_MAX}) {
            attack(bytes.substr(0, i) + Varint(wrong) + bytes.substr(i + n));
        }
    }
}

void ForEachWrongToken(const std::string& text, const Attack& attack) {
    const std::string tokens = std::string("{}[]:,\"\\u/ ") + '\0';
    for (size_t i = 0; i < text.size(); ++i) {
        for (char token : tokens) {
            std::string changed = text;
            changed[i] = token;
            attack(changed);
        }
    }
}

}  // namespace sorntest
