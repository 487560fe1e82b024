#pragma once

#include <cstring>

#include "rox/RoxString.h"
#include "sorn/dict/Rox1ByteBuffer.h"

namespace sorn {

/// The growing byte array in which all text output is built: a local variable, not reference counted. At most
/// 4,294,967,295 bytes, RoxAssertFail beyond. One thread at a time.
class ByteBuffer {
 public:
    /// Empty; the bytes will lie in the pool, null for the general heap.
    explicit ByteBuffer(RoxMempool* pool) : bytesM(pool) {}
    virtual ~ByteBuffer();
    ByteBuffer(const ByteBuffer&) = delete;
    ByteBuffer& operator=(const ByteBuffer&) = delete;

    void AppendByte(unsigned char b) { bytesM.AppendByte(b); }
    void AppendChar(char c) { bytesM.AppendByte(static_cast<unsigned char>(c)); }
    /// The bytes up to the NUL. The capacity grows as by AppendByte for each.
    void AppendString(const char* text);
    /// n bytes, which do not lie in this buffer.
    void AppendBytes(const void* bytes, unsigned n) { bytesM.AppendBytes(bytes, n); }
    /// All bytes of a text, NULs inside it included.
    void AppendText(const RoxString& text) { bytesM.AppendBytes(text.Utf8(), text.NByte()); }
    /// A literal as one run of bytes.
    template <unsigned n>
    void AppendLiteral(const char (&text)[n]) {
        bytesM.AppendBytes(text, n - 1);
    }

    /// For writers that know an upper bound: makes room for n more bytes and gives the place behind the last
    /// one, which holds until the next operation that is not const; Commit takes what was written there, at
    /// most n bytes, into the buffer.
    unsigned char* Reserve(unsigned n) { return bytesM.Reserve(n); }
    void Commit(unsigned n) { bytesM.Commit(n); }

    /// Replaces n bytes from `offset` on, all of which must be there.
    void Overwrite(unsigned offset, const void* bytes, unsigned n) { bytesM.Overwrite(offset, bytes, n); }

    /// Drops all bytes from `length` on, which must not be above the length; the capacity stays.
    void Truncate(unsigned length) { bytesM.Truncate(length); }
    void Clear() { bytesM.Truncate(0); }

    /// The first byte; it changes when the buffer grows, nothing stands behind the last byte, and without any
    /// byte there is nothing to read.
    const unsigned char* GetData() const { return bytesM.GetData(); }
    unsigned GetLength() const { return bytesM.GetLength(); }
    unsigned GetCapacity() const { return bytesM.GetCapacity(); }
    RoxMempool* GetMempool() const { return bytesM.GetMempool(); }

    /// The bytes as a string in the pool.
    RoxString ToRoxString(RoxMempool* pool) const {
        return RoxString::FromUtf8Bytes(pool, GetLength(), GetData());
    }

 private:
    Rox1ByteBuffer bytesM;
};

}  // namespace sorn
