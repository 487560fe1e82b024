#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace sorn::tools {

/// Reads an open descriptor in large pieces, taking what is there, as lines or whole. The descriptor stays
/// the caller's.
class LineReader {
 public:
    /// The library counts bytes of a text in 32 bits.
    static constexpr size_t maxRecordBytesG = 0xFFFFFFFF;

    explicit LineReader(int descriptor);

    /// Whether the next line is here already, so that ReadLine does not wait.
    bool FLineReady() const;
    /// The next line without its line feed; the last one may lack it. False at the end, or when FFailed.
    bool ReadLine(std::string& line);
    /// All that is left. False when it could not be read or is longer than maxRecordBytesG.
    bool ReadAll(std::string& text);
    /// Whether reading failed, or a record is longer than maxRecordBytesG.
    bool FFailed() const { return fFailedM; }
    /// Words about that, after FFailed.
    std::string FailureWords() const;

 private:
    /// The next piece; false at the end or on failure.
    bool Refill();
    /// Takes up to `n` bytes at the front of the piece; false when the text grows too long.
    bool Take(size_t n, std::string& text);

    int descriptorM;
    std::vector<char> vPieceM;
    size_t nextM = 0;
    size_t endM = 0;
    bool fFailedM = false;
    int errorM = 0;  // of the system, when reading failed
};

}  // namespace sorn::tools
