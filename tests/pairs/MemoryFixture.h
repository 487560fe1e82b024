#pragma once

#include <gtest/gtest.h>

#include <string>

namespace sorntest {

constexpr size_t KiB = 1024;
constexpr size_t MiB = 1024 * KiB;

/// What every read may take, whatever its input.
constexpr size_t freeBytes = 64 * KiB;

enum class Codec { handParser, streamParser, typedMemory, typedStream, binary, dictionaryRoad };

/// Reads whose peak of memory is measured, pool and general heap together.
class MemoryFixture : public ::testing::Test {
 protected:
    struct Measured {
        bool isRead;
        size_t peak;
        size_t input;
        double Factor() const {
            return static_cast<double>(peak < freeBytes ? 0 : peak - freeBytes) / static_cast<double>(input);
        }
    };

    /// The peak of one read in a pool of its own; the input lies elsewhere. The same was read once before:
    /// what the process keeps of a first use is not counted.
    static Measured Measure(Codec codec, const std::string& input);
    static void Report(const std::string& what, Codec codec, const Measured& measured);
    /// A read takes at most `limit` times its input above freeBytes.
    static void ExpectFactor(const std::string& what, Codec codec, const std::string& input, double limit,
                             bool mustRead);

    void TearDown() override;

    /// `piece` again and again.
    static std::string Repeated(const std::string& piece, size_t size);
    /// A record with `piece` in one list of a field, of no more than a container holds.
    static std::string InField(const char* type, const char* field, const std::string& piece, size_t size);

 private:
    static Measured MeasureOnce(Codec codec, const std::string& input);
};

}  // namespace sorntest
