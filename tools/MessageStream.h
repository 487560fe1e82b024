#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "rox/RoxString.h"
#include "sorn/rpc/OrvoRpcV2Packetizer.h"

namespace sorn::tools {

/// Cuts a stream of messages from an open descriptor, which stays the caller's, as they come.
class MessageStream {
 public:
    enum Piece {
        MESSAGE,     ///< as many bytes as its first line says
        JUNK,        ///< a bad first line and all up to the next text that looks like one; it is not kept
        UNFINISHED,  ///< the stream ended within it
        END,
        FAILED,  ///< reading failed, told by errno
    };

    /// `willWait` is called before every read.
    MessageStream(int descriptor, std::function<void()> willWait);

    /// The next piece of the stream: of a MESSAGE its bytes, of JUNK the words about the first line.
    Piece Next(RoxString& bytes, RoxString& words);
    /// Where the piece began, in bytes from the start of the stream.
    uint64_t GetOffset() const { return offsetM; }
    /// Bytes of the piece, but of one that FAILED.
    uint64_t GetLength() const { return takenM - offsetM; }

 private:
    enum Filled { SOME, NONE, ERROR };

    Filled Fill();
    void SkipJunk();
    void Skip(size_t n);
    bool FBadFirstLine();

    int descriptorM;
    std::function<void()> willWaitM;
    OrvoRpcV2Packetizer packetizerM;
    std::string bufferM;
    size_t beginM = 0;  ///< in the buffer, of what was not given yet
    uint64_t takenM = 0;
    uint64_t offsetM = 0;
};

}  // namespace sorn::tools
