#pragma once

#include <cstdint>

#include "rox/ref.h"

class RoxMempool;

namespace sorn {

class Dictionary;

/// Lazy bodies inside lazy bodies, beyond which writing stops converting them.
constexpr uint32_t maxLazyLevelsG = 1000;

/// What one walk of the encoder may read again of JSON text: a body of text that lies in another one's text
/// was read with that one already, so that nested bodies could cost their depth times their bytes. Bodies
/// that lie in no other text are read once each and give an allowance with their bytes; those inside take
/// from it. So text in text that is no more than 17 deep is always converted, and deeper text when it is
/// short. One thread at a time.
class LazyTextBudget {
 public:
    /// The allowance of every walk: at maxLazyLevelsG that is enough for bodies of 64 KiB.
    static constexpr uint64_t freeBytesG = 64 * 1024 * 1024;
    /// And for each byte of text in no other text.
    static constexpr uint64_t bytesPerTextByteG = 16;

    /// Notes a body with n bytes of text in no other text.
    void AddOuter(uint32_t n) { nLeftM += n * bytesPerTextByteG; }
    /// Takes n bytes for a body in a text; false, and takes nothing, when fewer are left.
    bool TakeInner(uint32_t n) {
        if (n > nLeftM) return false;
        nLeftM -= n;
        return true;
    }

 private:
    uint64_t nLeftM = freeBytesG;
};

/// What is written in place of a body beyond these limits: the dictionary of an error, in the pool.
ref<Dictionary> NewTooDeepError(RoxMempool* pool);

}  // namespace sorn
