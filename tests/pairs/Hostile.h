#pragma once

#include <cstddef>
#include <functional>
#include <string>
#include <vector>

#include "kelbaselib/Bytesource.h"

namespace sorntest {

/// Bytes on the heap at their exact size, so that a sanitizer sees a read beyond them.
class ExactBytes {
 public:
    explicit ExactBytes(const std::string& bytes);
    ~ExactBytes() { delete[] pDataM; }
    ExactBytes(const ExactBytes&) = delete;
    ExactBytes& operator=(const ExactBytes&) = delete;

    const unsigned char* Data() const { return pDataM; }
    int Length() const { return static_cast<int>(lengthM); }

 private:
    unsigned char* pDataM;
    size_t lengthM;
};

/// A source that gives at most `piece` bytes at a time. The bytes outlive it.
class PieceSource final : public kelbaselib::Bytesource {
 public:
    PieceSource(const std::string& bytes, unsigned piece) : bytesM(bytes), pieceM(piece) {}

    unsigned Read(void* buffer, unsigned capacity) override;
    kelbaselib::Bytesource* NewSource() override { return new PieceSource(bytesM, pieceM); }
    unsigned GetAvailable() const override { return 0; }
    void Release() override { delete this; }

 private:
    const std::string& bytesM;
    unsigned pieceM;
    size_t positionM = 0;
};

/// Standard output goes nowhere while one lives: the binary reader tells there of each unknown field.
class QuietOutput {
 public:
    QuietOutput();
    ~QuietOutput();
    QuietOutput(const QuietOutput&) = delete;
    QuietOutput& operator=(const QuietOutput&) = delete;

 private:
    int savedM;
};

using Attack = std::function<void(const std::string& bytes)>;

/// Cut off behind every byte.
void ForEachTruncation(const std::string& bytes, const Attack& attack);
/// Every single bit the other way.
void ForEachBitFlip(const std::string& bytes, const Attack& attack);
/// At every place the number that stands there, which may be a length, replaced by 0, its neighbours, 2^31,
/// 2^32 - 1 and 2^64 - 1.
void ForEachWrongNumber(const std::string& bytes, const Attack& attack);
/// At every place a byte of the syntax of JSON in place of what stands there.
void ForEachWrongToken(const std::string& text, const Attack& attack);

}  // namespace sorntest
