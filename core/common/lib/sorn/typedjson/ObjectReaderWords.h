#pragma once

#include <cstddef>

#include "sorn/convert/ErrorWords.h"
#include "sorn/typedjson/ObjectReaderLevels.h"

namespace sorn {

/// The words of a failing read, which its parts share. They are dropped while the read is inside an object of
/// a typed field, as is required: what goes wrong there stays untold.
class ObjectReaderWords {
 public:
    ObjectReaderWords(RoxMempool* pool, RoxString& target) : wordsM(pool, target) {}

    void SetSilent(bool isSilent) { isSilentM = isSilent; }
    bool FSilent() const { return isSilentM; }

    /// Each gives false, for callers that fail with it.
    bool Replace(const char* text) {
        if (!isSilentM) wordsM.Replace(text);
        return false;
    }
    bool Append(const char* text, const char* more = "");
    /// What the readers of a value add when it is bad: for the arrays around it up to the member, and for a
    /// single one.
    bool AppendValueWords(const ObjectReaderLevels& levels, size_t nLevels);
    /// The part of it that arrays add: for one that has no right end.
    bool AppendArrayWords(const ObjectReaderLevels& levels, size_t nLevels);
    bool AppendKeyWords(const char* key);
    void Commit() { wordsM.Commit(); }

    /// Bytes that may be appended. With each byte of input the words of a nest grow by 33, and nobody reads
    /// that many: a piece that would go beyond it stays out, with all that come behind it, and restWordsG
    /// stand there instead.
    static constexpr size_t maxBytesG = 1u << 20;
    static constexpr const char* restWordsG = " The rest of the words is left out.";

 private:
    ErrorWords wordsM;
    size_t nByteM = 0;
    bool isFullM = false;
    bool isSilentM = false;
};

}  // namespace sorn
