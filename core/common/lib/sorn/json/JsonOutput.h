#pragma once

#include <cstddef>
#include <cstring>

#include "rox/RoxString.h"

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;

/// Where the JSON writers put their bytes: a window of memory that is written directly and changed for a new
/// one when it is full. One writer thus serves byte buffers and sinks alike. One thread at a time.
class JsonOutput {
 public:
    /// The most that Room may be asked for.
    static constexpr unsigned maxRoomG = 1024;

    JsonOutput(const JsonOutput&) = delete;
    JsonOutput& operator=(const JsonOutput&) = delete;

    /// A place to write n bytes to, n <= maxRoomG; Written then tells the end of what was written there.
    unsigned char* Room(unsigned n) {
        if (static_cast<size_t>(pEndM - pNextM) < n) [[unlikely]]
            NextWindow(n);
        return pNextM;
    }
    void Written(unsigned char* end) { pNextM = end; }

    void Byte(char c) {
        *Room(1) = static_cast<unsigned char>(c);
        ++pNextM;
    }
    /// Any number of bytes.
    void Bytes(const void* bytes, size_t n);
    template <size_t n>
    void Literal(const char (&text)[n]) {
        static_assert(n - 1 <= maxRoomG);
        std::memcpy(Room(n - 1), text, n - 1);
        pNextM += n - 1;
    }
    void Blanks(size_t n);

    /// Whether the text goes to a sink. Bodies that are objects have another text there:
    /// LazyDict::ToJsonBytesink.
    bool FSink() const { return isSinkM; }

 protected:
    explicit JsonOutput(bool isSink = false) : isSinkM(isSink) {}
    ~JsonOutput() = default;
    /// Hands on what stands in the window and opens one of at least n bytes.
    virtual void NextWindow(unsigned n) = 0;

    unsigned char* pBeginM = nullptr;  // the window
    unsigned char* pNextM = nullptr;
    unsigned char* pEndM = nullptr;

 private:
    bool isSinkM;
};

/// Writes behind what stands in a byte buffer, which must be left alone until this object is gone. A short
/// text goes into the buffer when it is whole, so that the buffer grows once.
class JsonBufferOutput final : public JsonOutput {
 public:
    explicit JsonBufferOutput(ByteBuffer& buffer);
    ~JsonBufferOutput() { Close(); }

 private:
    void NextWindow(unsigned n) override;
    void Close();

    ByteBuffer& bufferM;
    unsigned char firstM[4096];
};

/// Writes a text of its own and makes a string of it.
class JsonTextOutput final : public JsonOutput {
 public:
    explicit JsonTextOutput(RoxMempool* pool);
    ~JsonTextOutput();

    /// What was written, in the pool. Ends the writing.
    RoxString Take();

 private:
    void NextWindow(unsigned n) override;

    RoxMempool* pMempoolM;
    RoxStringRepN* pLongM = nullptr;  // holds a text for which the first window is too small
    unsigned char firstM[4096];
};

/// Writes to a sink in pieces of a fixed size. The last piece goes out when this object is gone. Once the
/// sink takes less than a whole piece, it gets nothing more.
class JsonSinkOutput final : public JsonOutput {
 public:
    static constexpr unsigned windowG = 4096;

    explicit JsonSinkOutput(kelbaselib::Bytesink& sink);
    ~JsonSinkOutput() { Flush(); }

 private:
    void NextWindow(unsigned n) override;
    void Flush();

    kelbaselib::Bytesink& sinkM;
    bool isFullM = false;
    unsigned char windowM[windowG];
};

}  // namespace sorn
