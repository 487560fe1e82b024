#pragma once

#include <cstdint>

#include "sorn/json/ByteClass.h"
#include "sorn/json/TextScan.h"

class RoxMempool;

namespace kelbaselib {
class Bytesource;
class InMemoryBytesource;
class InMemoryBytestream;
}  // namespace kelbaselib

namespace sorn {

/// A cursor over JSON text, in memory or in a byte source, with the block around it. It can also copy what it
/// passes. Holds its block inline, so that it is used on the stack of one call and one thread. It owns
/// neither the bytes nor the source. While it captures it holds the bytes that it has copied, and no
/// destructor gives them back: whoever starts a capture ends it with FinishCapture or DropCapture, after a
/// failure too.
class InputPointerBytesource {
 public:
    static constexpr unsigned blockBytesG = 16384;

    /// Over bytes of the caller's, which stay until the cursor is gone.
    InputPointerBytesource(const unsigned char* data, unsigned length);
    /// Over a source, which is read in whole blocks from where it stands; null is a source at its end.
    explicit InputPointerBytesource(kelbaselib::Bytesource* source);
    /// Over the bytes of a source in memory, from where it stands, as they lie there: the source itself is
    /// not read. What is captured shares its storage where that costs no memory.
    explicit InputPointerBytesource(kelbaselib::InMemoryBytesource& source);
    /// The fitting one of the two for a source, which may be null.
    static InputPointerBytesource Over(kelbaselib::Bytesource* source);
    InputPointerBytesource(const InputPointerBytesource&) = delete;
    InputPointerBytesource& operator=(const InputPointerBytesource&) = delete;

    /// For a cursor that stands at pEndM: brings the next block. False at the end of the input, and of each
    /// read in it that gives nothing; a source is asked again at the next attempt. What was passed goes to
    /// the capture sink first.
    bool Refill();
    /// Steps over white space, across blocks.
    void SkipWhitespace() { FSkipToByte(); }

    /// Whether there is a byte at pCurrentM; brings the next block for it.
    bool FByte() { return pCurrentM != pEndM || Refill(); }
    /// The same behind white space.
    bool FSkipToByte() {
        pCurrentM = textscan::SkipWhitespace(pCurrentM, pEndM);
        return pCurrentM != pEndM || SkipInNextBlocks();
    }
    /// Whether the next byte behind white space is this one.
    bool FSkipTo(unsigned char byte) { return FSkipToByte() && *pCurrentM == byte; }
    /// The same, and it is consumed.
    bool FTake(unsigned char byte) {
        if (!FSkipTo(byte)) return false;
        ++pCurrentM;
        return true;
    }

    /// Begins to capture what is passed from here on; bytes are copied into the pool. Not while it captures.
    void StartCapture(RoxMempool* pool);
    /// Ends the capture and gives a source over the bytes, at its start, which the caller then owns.
    kelbaselib::Bytesource* FinishCapture();
    /// Ends the capture and drops the bytes.
    void DropCapture();

    /// Bytes taken from the source, or handed in. Of a source in memory: what reading it in blocks would have
    /// taken when it came here, if it did not look at the byte at pCurrentM.
    uint32_t TakenBytes() const {
        return pMemorySourceM == nullptr ? consumedLengthM + lastReadLengthM : TakenInBlocks();
    }
    /// Whether such a look would have taken one block more.
    bool FAtEndOfBlock() const;

    kelbaselib::Bytesource* pSourceM;
    unsigned char bufferM[blockBytesG];  ///< the block of a source
    const unsigned char* pCurrentM;      ///< next byte to read
    const unsigned char* pEndM;          ///< one past the last byte of the block
    uint32_t lastReadLengthM;            ///< bytes of the last read
    uint32_t consumedLengthM = 0;        ///< bytes of all earlier reads, modulo 2^32
    bool canRefillM;                     ///< false: nothing comes behind pEndM
    bool isCapturingM = false;
    const unsigned char* pCaptureStartM = nullptr;            ///< first byte that was not copied yet
    kelbaselib::InMemoryBytestream* pCaptureSinkM = nullptr;  ///< made by the first copy, the cursor's own

 private:
    bool SkipInNextBlocks();
    uint32_t TakenInBlocks() const;
    bool FShares() const;
    void CopyToSink();

    kelbaselib::InMemoryBytesource* pMemorySourceM = nullptr;
    const unsigned char* pMemoryM = nullptr;  ///< where its bytes begin
    RoxMempool* pCapturePoolM = nullptr;
};

}  // namespace sorn
