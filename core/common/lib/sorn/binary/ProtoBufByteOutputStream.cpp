#include "sorn/binary/ProtoBufByteOutputStream.h"

#include <cstdint>
#include <cstring>

#include "rox/RoxAssert.h"
#include "rox/RoxMempool.h"
#include "rox/RoxWorkStack.h"

namespace sorn {

namespace {

/// A section whose inner one is being decoded.
struct OuterSection {
    size_t destination;  ///< where the final form of the inner one ends
    size_t nGrown;       ///< by how many bytes the contents have grown in the outer one
};

/// Bytes that are searched at once. Sanitizers check all of the range, wherever in it the byte is found.
constexpr size_t maxRunG = 1024;

}  // namespace

ProtoBufByteOutputStream::~ProtoBufByteOutputStream() {
    RoxMempool::FreeIn(nullptr, dataM);
}

/// Room for n more bytes.
void ProtoBufByteOutputStream::Reserve(size_t n) {
    if (n <= capacityM - sizeM) return;
    RoxAssert(n <= SIZE_MAX / 4 && sizeM <= SIZE_MAX / 4, "ProtoBufByteOutputStream: too many bytes");
    size_t capacity = capacityM == 0 ? 1 : capacityM;
    while (capacity - sizeM < n) capacity *= 2;
    dataM = static_cast<unsigned char*>(RoxMempool::ReallocIn(nullptr, dataM, capacity));
    capacityM = capacity;
}

void ProtoBufByteOutputStream::AppendByte(unsigned char byte) {
    Reserve(1);
    dataM[sizeM++] = byte;
}

void ProtoBufByteOutputStream::AppendRun(const unsigned char* data, size_t n) {
    if (n == 0) return;
    Reserve(n);
    std::memcpy(dataM + sizeM, data, n);
    sizeM += n;
}

void ProtoBufByteOutputStream::WriteBytes(const unsigned char* data, unsigned count) {
    while (count != 0) {
        const void* const found = std::memchr(data, escapeG, count);
        if (found == nullptr) return AppendRun(data, count);
        const auto n = static_cast<unsigned>(static_cast<const unsigned char*>(found) - data) + 1;
        AppendRun(data, n);
        AppendByte(escapeG);
        data += n;
        count -= n;
    }
}

void ProtoBufByteOutputStream::WriteString(const RoxString& text) {
    StartSection();
    WriteBytes(reinterpret_cast<const unsigned char*>(text.Utf8()), text.NByte());
    EndSection();
}

void ProtoBufByteOutputStream::StartSection() {
    AppendByte(startG);
    AppendByte(escapeG);
}

void ProtoBufByteOutputStream::EndSection() {
    AppendByte(endG);
    AppendByte(escapeG);
}

size_t ProtoBufByteOutputStream::Finish(const unsigned char*& data, unsigned& length) {
    Position cursor = sizeM;
    Position destination = sizeM;
    const size_t nGrown = FinishOneSection(cursor, destination);
    const size_t n = sizeM - destination;
    RoxAssert(n <= UINT32_MAX, "ProtoBufByteOutputStream: 4 GiB or more");
    data = dataM + destination;
    length = static_cast<unsigned>(n);
    return nGrown;
}

size_t ProtoBufByteOutputStream::FinishOneSection(Position& cursor, Position& destination) {
    RoxWorkStack<OuterSection, 16> outerSections(nullptr);
    size_t nGrown = 0;
    for (;;) {
        bool fAtStart = cursor == 0;
        if (!fAtStart) {
            const size_t from = cursor > maxRunG ? cursor - maxRunG : 0;
            const void* const found = ::memrchr(dataM + from, escapeG, cursor - from);
            const size_t begin =
                found == nullptr ? from
                                 : static_cast<size_t>(static_cast<const unsigned char*>(found) - dataM) + 1;
            const size_t nRun = cursor - begin;
            destination -= nRun;
            std::memmove(dataM + destination, dataM + begin, nRun);
            cursor = begin;
            if (found == nullptr) continue;
            cursor = begin >= 2 ? begin - 2 : 0;  // over the escape byte and its kind
            if (begin < 2) continue;
            const unsigned char kind = dataM[cursor];
            fAtStart = kind == startG;
            if (kind == endG) {
                outerSections.Emplace(destination, nGrown);
                nGrown = 0;
            } else if (!fAtStart) {
                dataM[--destination] = kind;
            }
        }
        if (!fAtStart) continue;
        if (outerSections.FEmpty()) return nGrown;
        const OuterSection outer = outerSections.Top();
        outerSections.Pop();
        // What made the array grow did not move the destination down.
        const size_t length = nGrown + (outer.destination - destination);
        RoxAssert(length <= UINT32_MAX, "ProtoBufByteOutputStream: a section of 4 GiB or more");
        nGrown += InsertLength(static_cast<unsigned>(length), cursor, destination);
        nGrown += outer.nGrown;
    }
}

size_t ProtoBufByteOutputStream::InsertLength(unsigned length, Position& cursor, Position& destination) {
    size_t nGrown = 0;
    unsigned char more = 0;  // the byte that goes in first stands last and has no top bit
    for (int shift = 28; shift >= 0; shift -= 7) {
        if (length >> shift == 0 && shift != 0) continue;
        const auto group = static_cast<unsigned char>((length >> shift & 0x7F) | more);
        nGrown += InsertByte(group, cursor, destination);
        more = 0x80;
    }
    return nGrown;
}

size_t ProtoBufByteOutputStream::InsertByte(unsigned char byte, Position& cursor, Position& destination) {
    if (cursor < destination) {
        dataM[--destination] = byte;
        return 0;
    }
    Reserve(1);
    std::memmove(dataM + destination + 1, dataM + destination, sizeM - destination);
    dataM[destination] = byte;
    ++sizeM;
    return 1;
}

}  // namespace sorn
