#include "sorn/model/SornHashTableUtil.h"

#include <bit>

namespace sorn {

const uint8_t SornHashTableUtil::littleEndianG = 1;
const int32_t SornHashTableUtil::hashTableSizesG[nHashTableSizesG] = {
    53,     769,     3079,    12289,   49157,    98317,    196613,   393241,
    786433, 1572869, 3145739, 6291469, 12582917, 25165843, 50331653, 100663319,
};

namespace {

constexpr int groupBytesG = 4;
constexpr int roundBytesG = 3 * groupBytesG;  // one group for each of the three words

/// The state of lookup3 (B. Jenkins, 2006, public domain).
struct Words {
    uint32_t a;
    uint32_t b;
    uint32_t c;

    void Mix() {
        a -= c, a ^= std::rotl(c, 4), c += b;
        b -= a, b ^= std::rotl(a, 6), a += c;
        c -= b, c ^= std::rotl(b, 8), b += a;
        a -= c, a ^= std::rotl(c, 16), c += b;
        b -= a, b ^= std::rotl(a, 19), a += c;
        c -= b, c ^= std::rotl(b, 4), b += a;
    }

    void Final() {
        c ^= b, c -= std::rotl(b, 14);
        a ^= c, a -= std::rotl(c, 11);
        b ^= a, b -= std::rotl(a, 25);
        c ^= b, c -= std::rotl(b, 16);
        a ^= c, a -= std::rotl(c, 4);
        b ^= a, b -= std::rotl(a, 14);
        c ^= b, c -= std::rotl(b, 24);
    }
};

/// The word of a group of which at most four bytes are there; the others count as 0.
template <bool fLittleEndian>
uint32_t Group(const unsigned char* bytes, int count) {
    uint32_t word = 0;
    for (int i = 0; i < groupBytesG && i < count; ++i) {
        const int place = fLittleEndian ? i : groupBytesG - 1 - i;
        word |= uint32_t{bytes[i]} << (8 * place);
    }
    return word;
}

template <bool fLittleEndian>
void AddRound(Words& words, const unsigned char* bytes, int count) {
    words.a += Group<fLittleEndian>(bytes, count);
    if (count > groupBytesG) words.b += Group<fLittleEndian>(bytes + groupBytesG, count - groupBytesG);
    if (count > 2 * groupBytesG)
        words.c += Group<fLittleEndian>(bytes + 2 * groupBytesG, count - 2 * groupBytesG);
}

}  // namespace

template <bool fLittleEndian>
uint32_t SornHashTableUtil::HashInOrder(const unsigned char* bytes, int length) {
    const uint32_t start = 0xDEADBEEF + static_cast<uint32_t>(length);
    Words words{start, start, start};
    for (; length > roundBytesG; length -= roundBytesG, bytes += roundBytesG) {
        AddRound<fLittleEndian>(words, bytes, roundBytesG);
        words.Mix();
    }
    AddRound<fLittleEndian>(words, bytes, length);
    words.Final();  // for no bytes too, where the published function gives c as it stands
    return words.c;
}

template uint32_t SornHashTableUtil::HashInOrder<true>(const unsigned char* bytes, int length);
template uint32_t SornHashTableUtil::HashInOrder<false>(const unsigned char* bytes, int length);

uint32_t SornHashTableUtil::Hash(const unsigned char* bytes, int length) {
    return littleEndianG != 0 ? HashInOrder<true>(bytes, length) : HashInOrder<false>(bytes, length);
}

}  // namespace sorn
