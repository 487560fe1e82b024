#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "rox/RoxMempool.h"
#include "rox/RoxString.h"
#include "rox/RoxStringArray.h"
#include "rox/ref.h"
#include "sorn/dict/RoxByteBuffer.h"

/// The same numbers in every run.
class Random {
 public:
    explicit Random(unsigned seed) : engineM(seed) {}
    uint64_t Bits() { return engineM(); }
    unsigned Below(size_t n) { return static_cast<unsigned>(engineM() % n); }

 private:
    std::mt19937_64 engineM;
};

/// A pool that must be empty again at the end of each test, and short ways to make and read texts and bytes.
class DictFixture : public testing::Test {
 protected:
    void TearDown() override { EXPECT_EQ(pool.GetUsedBytes(), 0u) << "something is still alive"; }

    RoxString Text(std::string_view text) {
        return RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(text.size()), text.data());
    }
    ref<rox::ByteBuffer> Bytes(std::string_view bytes) {
        return rox::ByteBuffer::New(&pool, bytes.data(), static_cast<uint32_t>(bytes.size()));
    }
    static std::string Str(const RoxString& text) { return std::string(text.View()); }
    static std::string Str(const ref<rox::ByteBuffer>& bytes) {
        if (bytes->GetLength() == 0) return std::string();
        return std::string(reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength());
    }
    static std::vector<std::string> Strs(const RoxStringArray& texts) {
        std::vector<std::string> result;
        for (unsigned i = 0; i < texts.GetCount(); ++i) result.push_back(Str(texts[i]));
        return result;
    }

    RoxMempool pool{"test"};
};

using Strings = std::vector<std::string>;
