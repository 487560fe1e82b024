#include "rox/RoxString.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>

#include "rox/RoxAssert.h"
#include "rox/RoxUtf8.h"

namespace {

size_t LengthOf(const char* utf8) {
    return utf8 != nullptr ? strlen(utf8) : 0;
}

bool FWhiteSpace(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

}  // namespace

/// A new representation, or null for no bytes.
RoxStringRepN* RoxString::NewRep(RoxMempool* pool, size_t n, const void* bytes) {
    if (n == 0) {
        return nullptr;
    }
    RoxAssert(n <= UINT32_MAX, "RoxString: text of 4 GiB or more");
    RoxStringRepN* rep = RoxStringRepN::New(pool, static_cast<uint32_t>(n));
    memcpy(rep->MutableBytes(), bytes, n);
    return rep;
}

RoxStringRepN* RoxString::FormatRep(RoxMempool* pool, const char* format, va_list args) {
    char text[512];
    va_list again;
    va_copy(again, args);
    int n = vsnprintf(text, sizeof(text), format, args);
    RoxStringRepN* rep = nullptr;
    if (n > 0 && static_cast<size_t>(n) < sizeof(text)) {
        rep = NewRep(pool, static_cast<size_t>(n), text);
    } else if (n > 0) {
        rep = RoxStringRepN::New(pool, static_cast<uint32_t>(n));
        vsnprintf(rep->MutableBytes(), static_cast<size_t>(n) + 1, format, again);
    }
    va_end(again);
    return rep;
}

RoxString::RoxString(const char* utf8) : RoxString(nullptr, utf8) {}

RoxString::RoxString(RoxMempool* pool, const char* utf8) : pRepM(NewRep(pool, LengthOf(utf8), utf8)) {}

RoxString& RoxString::operator=(const char* utf8) {
    RoxStringRepN* rep = NewRep(GetMempool(), LengthOf(utf8), utf8);
    DownRef(std::exchange(pRepM, rep));
    return *this;
}

bool RoxString::FEqual(const char* utf8) const {
    size_t n = LengthOf(utf8);
    return n == NByte() && (n == 0 || memcmp(Utf8(), utf8, n) == 0);
}

RoxString RoxString::FromUtf8Bytes(RoxMempool* pool, unsigned n, const void* bytes) {
    return RoxString(Adopt(), NewRep(pool, n, bytes));
}

RoxString RoxString::FromUtf8Bytes(unsigned n, const void* bytes) const {
    return FromUtf8Bytes(GetMempool(), n, bytes);
}

RoxString RoxString::Format(const char* format, ...) {
    va_list args;
    va_start(args, format);
    RoxString result(Adopt(), FormatRep(nullptr, format, args));
    va_end(args);
    return result;
}

RoxString RoxString::Format(RoxMempool* pool, const char* format, ...) {
    va_list args;
    va_start(args, format);
    RoxString result(Adopt(), FormatRep(pool, format, args));
    va_end(args);
    return result;
}

void RoxString::FormatAndSet(const char* format, ...) {
    va_list args;
    va_start(args, format);
    RoxStringRepN* rep = FormatRep(GetMempool(), format, args);
    va_end(args);
    // The old text goes last: the arguments may lie in it.
    DownRef(std::exchange(pRepM, rep));
}

/// Bytes `begin` to before `end`, with begin <= end <= NByte().
RoxString RoxString::Part(uint32_t begin, uint32_t end) const {
    if (begin == 0 && end == NByte()) {
        return *this;
    }
    return FromUtf8Bytes(end - begin, Utf8() + begin);
}

RoxString RoxString::Trim() const {
    const char* bytes = Utf8();
    uint32_t begin = 0;
    uint32_t end = NByte();
    while (begin < end && FWhiteSpace(bytes[begin])) {
        ++begin;
    }
    while (begin < end && FWhiteSpace(bytes[end - 1])) {
        --end;
    }
    return Part(begin, end);
}

RoxString RoxString::Left(RoxStringPos pos) const {
    return Part(0, std::min(pos.offsetM, NByte()));
}

RoxString RoxString::Right(RoxStringPos pos) const {
    return Part(std::min(pos.offsetM, NByte()), NByte());
}

RoxString RoxString::Middle(RoxStringPos begin, RoxStringPos end) const {
    uint32_t endOffset = std::min(end.offsetM, NByte());
    return Part(std::min(begin.offsetM, endOffset), endOffset);
}

bool RoxString::Find(std::string_view text, RoxStringPos& pos) const {
    if (text.empty()) {
        pos = RoxStringPos();
        return true;
    }
    // memmem is linear in both lengths, which a comparison at each place is not.
    const void* found = memmem(Utf8(), NByte(), text.data(), text.size());
    if (found == nullptr) {
        return false;
    }
    pos = RoxStringPos(static_cast<uint32_t>(static_cast<const char*>(found) - Utf8()));
    return true;
}

bool RoxString::FindString(const RoxString& text, RoxStringPos& pos) const {
    return Find(text.View(), pos);
}

bool RoxString::FindString(const char* text, RoxStringPos& pos) const {
    return Find({text, LengthOf(text)}, pos);
}

RoxStringPos RoxString::AdvancePos(RoxStringPos pos, unsigned n) const {
    const unsigned char* bytes = reinterpret_cast<const unsigned char*>(Utf8());
    size_t length = NByte();
    size_t offset = std::min<size_t>(pos.offsetM, length);
    for (; n > 0 && offset < length; --n) {
        offset += RoxUtf8CharacterLength(bytes + offset, length - offset);
    }
    return RoxStringPos(static_cast<uint32_t>(offset));
}
