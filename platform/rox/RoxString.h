#pragma once

#include <cstring>
#include <string_view>
#include <utility>

#include "rox/RoxStringPos.h"
#include "rox/RoxStringRepN.h"

class RoxMempool;

/// Immutable UTF-8 text of one word, at most 4,294,967,295 bytes, NUL-terminated; NUL bytes inside are
/// allowed and counted. Copies share one representation. The empty string has none, hence no pool. "This
/// string's pool" below is the pool of its representation, the general heap when it is empty.
///
/// A RoxString belongs to one thread at a time; copies of it may live on others. A string must die before its
/// pool.
class RoxString {
 public:
    RoxString() = default;
    /// Text up to the NUL, on the general heap. Null is the empty string.
    RoxString(const char* utf8);
    RoxString(RoxMempool* pool, const char* utf8);
    /// Takes a hold of its own on `rep`, which may be null.
    explicit RoxString(RoxStringRepN* rep) : pRepM(rep) { UpRef(); }
    RoxString(const RoxString& other) : pRepM(other.pRepM) { UpRef(); }
    RoxString(RoxString&& other) noexcept : pRepM(std::exchange(other.pRepM, nullptr)) {}
    ~RoxString() { DownRef(pRepM); }

    RoxString& operator=(const RoxString& other) {
        other.UpRef();
        DownRef(std::exchange(pRepM, other.pRepM));
        return *this;
    }
    RoxString& operator=(RoxString&& other) noexcept {
        DownRef(std::exchange(pRepM, std::exchange(other.pRepM, nullptr)));
        return *this;
    }
    /// Replaces the value, in this string's pool. `utf8` may point into this string.
    RoxString& operator=(const char* utf8);

    /// NUL-terminated bytes, never null; valid while this value or a copy of it lives.
    const char* Utf8() const { return pRepM != nullptr ? pRepM->GetBytes() : ""; }
    uint32_t NByte() const { return pRepM != nullptr ? pRepM->GetLength() : 0; }
    bool FEmpty() const { return pRepM == nullptr; }
    std::string_view View() const { return {Utf8(), NByte()}; }

    /// Byte for byte, over all bytes.
    bool FEqual(const RoxString& other) const {
        if (pRepM == other.pRepM) {
            return true;
        }
        uint32_t n = NByte();
        return n == other.NByte() && memcmp(Utf8(), other.Utf8(), n) == 0;
    }
    /// Null equals the empty string.
    bool FEqual(const char* utf8) const;
    bool operator==(const RoxString& other) const { return FEqual(other); }
    bool operator==(const char* utf8) const { return FEqual(utf8); }

    /// A string of n bytes (not NUL-terminated) in the given pool, or in this string's.
    static RoxString FromUtf8Bytes(RoxMempool* pool, unsigned n, const void* bytes);
    RoxString FromUtf8Bytes(unsigned n, const void* bytes) const;
    /// Shares `rep`, which may be null.
    static RoxString FromRepN(RoxStringRepN* rep) { return RoxString(rep); }
    /// Takes over the caller's hold on `rep`, which may be null: for one that RoxStringRepN::New has just
    /// given.
    static RoxString AdoptRepN(RoxStringRepN* rep) { return RoxString(Adopt(), rep); }

    /// Result of printf formatting, on the general heap or in a pool. What printf refuses gives the empty
    /// string.
    static RoxString Format(const char* format, ...) __attribute__((format(printf, 1, 2)));
    static RoxString Format(RoxMempool* pool, const char* format, ...) __attribute__((format(printf, 2, 3)));
    /// Sets this string to the printf result, in this string's pool. Arguments may point into this very
    /// string.
    void FormatAndSet(const char* format, ...) __attribute__((format(printf, 2, 3)));

    /// Copy without ASCII white space (blank, \t \n \v \f \r) at both ends.
    RoxString Trim() const;

    // Positions count characters: one well-formed UTF-8 sequence, or one byte that is part of none. All stop
    // at the end. Parts are made in this string's pool; the whole string and the empty one are shared.

    /// Text before pos, and from pos on.
    RoxString Left(RoxStringPos pos) const;
    RoxString Right(RoxStringPos pos) const;
    /// Text from `begin` to before `end`; empty when `end` is not behind `begin`.
    RoxString Middle(RoxStringPos begin, RoxStringPos end) const;
    /// Searches the whole string. True when found, with the place of the first occurrence in `pos`, which is
    /// else left as it was. The empty text is found at the start.
    bool FindString(const RoxString& text, RoxStringPos& pos) const;
    bool FindString(const char* text, RoxStringPos& pos) const;
    RoxStringPos AdvancePos(RoxStringPos pos, unsigned n) const;
    RoxStringPos GetCharacterPos(unsigned i) const { return AdvancePos(RoxStringPos(), i); }

    /// The representation without a hold on it; null when empty.
    RoxStringRepN* GetRepN() const { return pRepM; }
    /// In this string's pool; null for the general heap.
    RoxMempool* GetMempool() const { return pRepM != nullptr ? pRepM->GetMempool() : nullptr; }

 private:
    struct Adopt {};
    RoxString(Adopt, RoxStringRepN* rep) : pRepM(rep) {}
    static RoxStringRepN* NewRep(RoxMempool* pool, size_t n, const void* bytes);
    static RoxStringRepN* FormatRep(RoxMempool* pool, const char* format, __builtin_va_list args);
    RoxString Part(uint32_t begin, uint32_t end) const;
    bool Find(std::string_view text, RoxStringPos& pos) const;
    void UpRef() const {
        if (pRepM != nullptr) {
            pRepM->UpRef();
        }
    }
    static void DownRef(RoxStringRepN* rep) {
        if (rep != nullptr) {
            rep->DownRef();
        }
    }

    RoxStringRepN* pRepM = nullptr;
};

static_assert(sizeof(RoxString) == sizeof(void*), "a string is one word");
