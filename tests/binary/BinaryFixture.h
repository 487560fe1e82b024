#pragma once

#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "convert/ConvertFixture.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/binary/ProtoBufByteOutputStream.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"

namespace sorntest {

/// The bytes of a text such as "0A ff 00"; blanks do not count.
inline std::string Bytes(const std::string& hex) {
    std::string result;
    std::string digits;
    for (const char c : hex) {
        if (c == ' ') continue;
        digits += c;
        if (digits.size() < 2) continue;
        result += static_cast<char>(std::stoi(digits, nullptr, 16));
        digits.clear();
    }
    return result;
}

/// Two capital digits for each byte, with blanks between.
inline std::string Hex(const void* data, size_t n) {
    static const char* const digits = "0123456789ABCDEF";
    std::string result;
    for (size_t i = 0; i < n; ++i) {
        const unsigned byte = static_cast<const unsigned char*>(data)[i];
        if (i != 0) result += ' ';
        result += digits[byte >> 4];
        result += digits[byte & 15];
    }
    return result;
}
inline std::string Hex(const std::string& bytes) {
    return Hex(bytes.data(), bytes.size());
}
inline std::string Hex(const rox::ByteBuffer& bytes) {
    return Hex(bytes.GetData(), bytes.GetLength());
}

/// The shortest form of a number, worked out digit by digit to the base of 128.
inline std::string Varint(uint64_t value) {
    std::string result(1, static_cast<char>(value % 128));
    while ((value /= 128) != 0) {
        result.back() = static_cast<char>(result.back() | 0x80);
        result += static_cast<char>(value % 128);
    }
    return result;
}

/// A length and the bytes.
inline std::string Section(const std::string& bytes) {
    return Varint(bytes.size()) + bytes;
}

/// A copy in a block of exactly its size, so that AddressSanitizer sees a read outside it.
class ExactBytes {
 public:
    explicit ExactBytes(const std::string& bytes)
        : nM(bytes.size()), bytesM(new unsigned char[bytes.size()]) {
        if (nM != 0) std::memcpy(bytesM.get(), bytes.data(), nM);
    }
    const unsigned char* Begin() const { return bytesM.get(); }
    const unsigned char* End() const { return bytesM.get() + nM; }
    int Size() const { return static_cast<int>(nM); }

 private:
    size_t nM;
    std::unique_ptr<unsigned char[]> bytesM;
};

/// The bytes that a stream has got, as hex.
inline std::string Finished(sorn::ProtoBufByteOutputStream& stream) {
    const unsigned char* data = nullptr;
    unsigned length = 0;
    EXPECT_EQ(stream.Finish(data, length), 0u);
    return Hex(data, length);
}

class BinaryFixture : public ConvertFixture {
 protected:
    sorn::ProtoBuf Codec() {
        return sorn::ProtoBuf(&pool, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    }
    /// What `write` puts into a stream, as hex.
    template <class Write>
    static std::string Written(Write write) {
        sorn::ProtoBufByteOutputStream stream;
        write(stream);
        return Finished(stream);
    }
    std::string FieldsOf(const ref<sorn::SornObject>& object) {
        return Written(
            [&](sorn::ProtoBufByteOutputStream& stream) { Codec().Marshal(object.get(), stream); });
    }
    /// Reads bytes, given as hex, as the fields of a struct; null when they are refused.
    ref<sorn::SornObject> Read(unsigned structId, const std::string& hex) {
        const ExactBytes bytes(Bytes(hex));
        ref<sorn::SornObject> object;
        const bool isRead = Codec().Unmarshal(bytes.Begin(), bytes.Size(), structId, &object);
        EXPECT_EQ(isRead, object != nullptr);
        return object;
    }
    template <class T>
    ref<T> ReadAs(const std::string& hex) {
        return ref<T>(static_cast<T*>(Read(T::structIdG, hex).get()));
    }
    ref<sorn::Dict> DictOf(const std::string& json) {
        return ref<sorn::Dict>(new (&pool) sorn::Dict(Parse(json)));
    }
    std::string JsonOf(const ref<sorn::Dict>& dict) {
        return dict == nullptr ? "null" : Text(dict->ToString(false));
    }
};

}  // namespace sorntest
