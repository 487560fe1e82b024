#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

/// SipHash, the keyed hash of J.-P. Aumasson and D. J. Bernstein, with `nRounds` rounds for each word of the
/// input and `nFinal` at the end; and its variant for machines of 32-bit words. Little-endian hosts.
template <unsigned nRounds, unsigned nFinal>
class RoxSipHash {
 public:
    static uint64_t Hash64(uint64_t k0, uint64_t k1, const void* bytes, size_t n) {
        State<uint64_t> state{0x736F6D6570736575 ^ k0, 0x646F72616E646F6D ^ k1, 0x6C7967656E657261 ^ k0,
                              0x7465646279746573 ^ k1};
        Absorb(state, bytes, n);
        state.v2 ^= 0xFF;
        state.template Rounds<nFinal>();
        return state.v0 ^ state.v1 ^ state.v2 ^ state.v3;
    }

    static uint32_t Hash32(uint32_t k0, uint32_t k1, const void* bytes, size_t n) {
        State<uint32_t> state{k0, k1, 0x6C796765 ^ k0, 0x74656462 ^ k1};
        Absorb(state, bytes, n);
        state.v2 ^= 0xFF;
        state.template Rounds<nFinal>();
        return state.v1 ^ state.v3;
    }

 private:
    template <class Word>
    struct State {
        Word v0, v1, v2, v3;

        static Word Rotate(Word x, unsigned bits) { return x << bits | x >> (sizeof(Word) * 8 - bits); }

        template <unsigned n>
        void Rounds() {
            constexpr bool fWide = sizeof(Word) == 8;
            for (unsigned i = 0; i < n; ++i) {
                v0 += v1;
                v1 = Rotate(v1, fWide ? 13 : 5) ^ v0;
                v0 = Rotate(v0, fWide ? 32 : 16);
                v2 += v3;
                v3 = Rotate(v3, fWide ? 16 : 8) ^ v2;
                v0 += v3;
                v3 = Rotate(v3, fWide ? 21 : 7) ^ v0;
                v2 += v1;
                v1 = Rotate(v1, fWide ? 17 : 13) ^ v2;
                v2 = Rotate(v2, fWide ? 32 : 16);
            }
        }

        void Mix(Word m) {
            v3 ^= m;
            Rounds<nRounds>();
            v0 ^= m;
        }
    };

    template <class Word>
    static void Absorb(State<Word>& state, const void* bytes, size_t n) {
        const char* p = static_cast<const char*>(bytes);
        size_t left = n;
        for (; left >= sizeof(Word); left -= sizeof(Word), p += sizeof(Word)) {
            Word m;
            memcpy(&m, p, sizeof(m));
            state.Mix(m);
        }
        Word last = static_cast<Word>(n) << (sizeof(Word) * 8 - 8);
        for (size_t i = 0; i < left; ++i) {
            last |= static_cast<Word>(static_cast<unsigned char>(p[i])) << (8 * i);
        }
        state.Mix(last);
    }
};
