#pragma once

#include <cstddef>

#include "rox/RoxString.h"

namespace sorn {

/// An output of bytes in which sections may be opened before their lengths are known; Finish puts each length
/// in front of its section. Sections nest to any depth. Storage lies on the general heap. One thread at a
/// time.
///
/// While it is written it holds the marked form: literal bytes, a literal 0x64 twice, and around each section
/// the markers 0x01 0x64 and 0x02 0x64. The kind stands before the 0x64 because the form is decoded from its
/// end. Finish decodes it in one backward pass within the same storage; the lengths go where markers were.
class ProtoBufByteOutputStream {
 public:
    /// A place in the array, as an index: it stays valid when the array moves.
    using Position = size_t;

    ProtoBufByteOutputStream() = default;
    ProtoBufByteOutputStream(const ProtoBufByteOutputStream&) = delete;
    ProtoBufByteOutputStream& operator=(const ProtoBufByteOutputStream&) = delete;
    ~ProtoBufByteOutputStream();

    /// Appends to the marked form as it is: for this class, and for who makes marked forms by hand.
    void AppendByte(unsigned char byte);
    void WriteByte(unsigned char byte) {
        AppendByte(byte);
        if (byte == escapeG) AppendByte(byte);
    }
    void WriteBytes(const unsigned char* data, unsigned count);
    /// A section of the text's bytes.
    void WriteString(const RoxString& text);
    void StartSection();
    /// Closes the section opened last; each StartSection has one.
    void EndSection();

    /// Resolves the marked form. `data` and `length` get the final bytes, which lie in the stream until it is
    /// written to or destroyed. Gives by how many bytes the storage's contents grew, which is 0 as long as
    /// every section is shorter than 2^28 bytes. Once for a stream. RoxAssertFail when there are 4 GiB or
    /// more.
    size_t Finish(const unsigned char*& data, unsigned& length);

    // The steps of Finish: `cursor` is the end of what is still marked, `destination` the begin of what is
    // final.

    /// Decodes down to the start of the section that ends at the cursor, or to the begin of the array, all
    /// sections inside included. Gives by how many bytes the contents grew.
    size_t FinishOneSection(Position& cursor, Position& destination);
    /// Puts a length before the destination. Gives by how many bytes the contents grew.
    size_t InsertLength(unsigned length, Position& cursor, Position& destination);
    /// Puts a byte before the destination: into the room between cursor and destination, which gives 0. Where
    /// there is none, what begins at the destination moves up, the destination stays, and 1 is given.
    size_t InsertByte(unsigned char byte, Position& cursor, Position& destination);

    /// The contents: the marked form, and after Finish left-overs and the final form.
    const unsigned char* GetData() const { return dataM; }
    size_t GetSize() const { return sizeM; }

 private:
    static constexpr unsigned char escapeG = 0x64;
    static constexpr unsigned char startG = 0x01;
    static constexpr unsigned char endG = 0x02;

    void Reserve(size_t n);
    void AppendRun(const unsigned char* data, size_t n);

    unsigned char* dataM = nullptr;
    size_t sizeM = 0;
    size_t capacityM = 0;
};

}  // namespace sorn
