#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace sorntest {

/// A reader of the older form of messages that uses nothing of the library, for the lines of
/// BinaryWrapperFixture. What it does not read itself, bodies and whole messages of the other kinds, it asks
/// for.
struct BinaryWrapperModel {
    /// A known-dict value at the start of bytes as a line, empty when it does not unmarshal.
    std::function<std::string(const std::string&)> body;
    /// The whole of the bytes as a record, likewise.
    std::function<std::string(const std::string&)> record;

    std::string Read(const std::string& bytes) const;

 private:
    struct Cursor {
        const std::string& bytes;
        size_t at = 0;
        size_t Left() const { return bytes.size() - at; }
    };
    /// A number of at most `nMost` bytes; what is above 64 bits is lost.
    static bool Number(Cursor& in, unsigned nMost, uint64_t& value);
    static bool Number32(Cursor& in, uint32_t& value);
    static int32_t Unzigzag(uint32_t value) {
        return value % 2 == 0 ? static_cast<int32_t>(value / 2) : -static_cast<int32_t>(value / 2) - 1;
    }
    std::string ReadFields(Cursor& in, bool isRequest) const;
};

inline bool BinaryWrapperModel::Number(Cursor& in, unsigned nMost, uint64_t& value) {
    value = 0;
    for (unsigned i = 0; i < nMost; ++i) {
        if (in.Left() == 0) return false;
        const auto byte = static_cast<unsigned char>(in.bytes[in.at++]);
        if (i < 9) value += static_cast<uint64_t>(byte % 128) << (7 * i);
        if (i == 9) value += static_cast<uint64_t>(byte % 2) << 63;
        if (byte < 128) return true;
    }
    return false;
}

inline bool BinaryWrapperModel::Number32(Cursor& in, uint32_t& value) {
    uint64_t wide = 0;
    const bool isRead = Number(in, 5, wide);
    value = static_cast<uint32_t>(wide % (uint64_t{1} << 32));
    return isRead;
}

inline std::string BinaryWrapperModel::Read(const std::string& bytes) const {
    Cursor in{bytes};
    uint32_t tag = 0;
    if (!Number32(in, tag)) return "error 3: does not start with valid int";
    const uint32_t structId = tag / 8;
    if (structId == 974 || structId == 1449) {
        const std::string read = record(bytes);
        return read.empty() ? "error 3: failed to unmarshal" : read;
    }
    if (structId == 975 || structId == 976) return ReadFields(in, structId == 975);
    return "error 3: bad object type: " + std::to_string(structId);
}

inline std::string BinaryWrapperModel::ReadFields(Cursor& in, bool isRequest) const {
    const std::string bad = "error 3: wrapper did not unmarshal";
    uint32_t length = 0;
    if (!Number32(in, length)) return bad;
    if (length != in.Left()) return bad + ": length";
    uint32_t monitorOrFinal = 0;
    uint32_t rpcId = 0;
    uint32_t version = 0;
    uint32_t forget = 0;
    uint64_t partner = 0;
    bool hasBody = false;
    std::string bodyBytes;
    std::string shownPartner = "-";
    std::string shownForget = "-";
    while (in.Left() != 0) {
        uint32_t tag = 0;
        bool isGood = Number32(in, tag);
        const uint32_t number = tag / 8;
        if (!isGood || number == 0 || number > (isRequest ? 6u : 3u)) return bad;
        if (number == 1) isGood = Number32(in, monitorOrFinal) && monitorOrFinal < 2;
        if (number == 2) {
            uint32_t n = 0;
            isGood = Number32(in, n) && n <= in.Left();
            if (!isGood) return bad;
            hasBody = true;
            bodyBytes = in.bytes.substr(in.at, n);
            in.at += n;
        }
        if (number == 3) isGood = Number32(in, rpcId);
        if (number == 4) isGood = Number32(in, version);
        if (number == 5) {
            isGood = Number(in, 10, partner);
            shownPartner = std::to_string(partner % (uint64_t{1} << 32));
        }
        if (number == 6) {
            isGood = Number32(in, forget) && forget < 2;
            shownForget = std::to_string(forget);
        }
        if (!isGood) return bad;
    }
    if (!hasBody) return bad;
    std::string shownBody = body(bodyBytes);
    if (shownBody.empty()) {
        shownBody = std::string("error 3: ") + (isRequest ? "request" : "response") + " did not unmarshal";
    }
    const std::string shownId = " rpcId=" + std::to_string(Unzigzag(rpcId));
    if (!isRequest)
        return "response final=" + std::to_string(monitorOrFinal) + shownId + " body=" + shownBody;
    return "request monitor=" + std::to_string(monitorOrFinal) + shownId +
           " version=" + std::to_string(Unzigzag(version)) + " partner=" + shownPartner +
           " forget=" + shownForget + " body=" + shownBody;
}

}  // namespace sorntest
