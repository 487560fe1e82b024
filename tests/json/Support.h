#pragma once

#include <cstring>
#include <memory>
#include <string>
#include <string_view>

#include "kelbaselib/Bytesink.h"
#include "rox/RoxArray.h"
#include "rox/RoxMempool.h"
#include "rox/RoxString.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/json/JsonFormat.h"

namespace jsontest {

/// Keeps what it is given and how it came.
class StringSink final : public kelbaselib::Bytesink {
 public:
    unsigned Write(const void* bytes, unsigned count) override {
        textM.append(static_cast<const char*>(bytes), count);
        if (count > largestWriteM) largestWriteM = count;
        return count;
    }
    const std::string& GetText() const { return textM; }
    unsigned GetLargestWrite() const { return largestWriteM; }

 private:
    std::string textM;
    unsigned largestWriteM = 0;
};

inline RoxString Text(RoxMempool& pool, std::string_view text) {
    return RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(text.size()), text.data());
}

inline std::string String(const RoxString& text) {
    return std::string(text.View());
}

inline std::string String(const sorn::ByteBuffer& buffer) {
    if (buffer.GetLength() == 0) return {};
    return std::string(reinterpret_cast<const char*>(buffer.GetData()), buffer.GetLength());
}

/// A copy of a text in a block of exactly its size, so that AddressSanitizer sees a read outside it.
class ExactBytes {
 public:
    explicit ExactBytes(std::string_view text) : nM(text.size()), bytesM(new unsigned char[text.size()]) {
        if (nM > 0) std::memcpy(bytesM.get(), text.data(), nM);
    }
    const unsigned char* Begin() const { return bytesM.get(); }
    const unsigned char* End() const { return bytesM.get() + nM; }
    unsigned Size() const { return static_cast<unsigned>(nM); }

 private:
    size_t nM;
    std::unique_ptr<unsigned char[]> bytesM;
};

/// What a parse of a whole text gave: the compact text of the dictionary, or "error: " and the words.
inline std::string Parse(std::string_view text) {
    RoxMempool pool("parse");
    const ExactBytes bytes(text);
    RoxString error("left from before");
    const ref<sorn::Dictionary> dictionary =
        sorn::Dictionary::FromJson(bytes.Begin(), bytes.Size(), error, &pool);
    if (dictionary == nullptr) {
        // The words lie on the general heap, as the string did that they replace.
        return pool.GetUsedBytes() == 0 ? "error: " + String(error) : "bytes left behind after a failure";
    }
    return error.FEmpty() ? String(dictionary->ToJson(false)) : "words without failure: " + String(error);
}

}  // namespace jsontest
