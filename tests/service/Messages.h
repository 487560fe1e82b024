#pragma once

#include <cstdint>
#include <cstdlib>
#include <string>

namespace sorntest {

/// A message written by hand: its first line counts the parts.
inline std::string Framed(const std::string& headers, const std::string& body) {
    const std::string block = headers + "\r\n";
    return "ORPC/2 " + std::to_string(block.size()) + " " + std::to_string(body.size()) + "\r\n" + block +
           body;
}

struct RequestText {
    uint32_t rpcId;
    std::string type;
    std::string body;
    std::string count = "single";
    std::string action = {};
    int version = 42;

    std::string Message() const {
        return Framed((action.empty() ? "" : "Action: " + action + "\r\n") + "RequestType: " + type +
                          "\r\nResponseCount: " + count + "\r\nRpcId: " + std::to_string(rpcId) +
                          "\r\nSchemaVersion: " + std::to_string(version) + "\r\nType: request\r\n",
                      body);
    }
};

inline std::string UpdateText(uint32_t rpcId, const std::string& type, const std::string& body) {
    return Framed(
        "RequestType: " + type + "\r\nRpcId: " + std::to_string(rpcId) + "\r\nType: requestUpdate\r\n", body);
}

inline std::string CancelText(uint32_t rpcId) {
    return Framed("RpcId: " + std::to_string(rpcId) + "\r\nType: cancel\r\n", "");
}

/// A response taken apart by hand.
struct ResponseText {
    uint32_t rpcId = 0;
    bool isFinal = false;
    std::string body;

    explicit ResponseText(const std::string& message) {
        const size_t line = message.find("\r\n") + 2;
        const auto nHeaders = static_cast<size_t>(std::atol(message.c_str() + 7));
        const std::string headers = "\r\n" + message.substr(line, nHeaders);
        rpcId = static_cast<uint32_t>(
            std::strtoul(headers.c_str() + headers.find("\r\nRpcId: ") + 9, nullptr, 10));
        isFinal = headers.find("\r\nIsFinal: true\r\n") != std::string::npos;
        body = message.substr(line + nHeaders);
    }
    bool FError(const std::string& code) const {
        return isFinal && body.find("\"type\": \"error\"") != std::string::npos &&
               body.find("\"code\": \"" + code + "\"") != std::string::npos;
    }
};

inline constexpr char successG[] = R"({"type": "success"})";

/// A recording of the fewest fields, and more.
inline std::string Recording(int number, const std::string& more = "") {
    return R"({"type": "recording", "bodyId": "b", "recordingId": "vuka:rc.)" + std::to_string(number) +
           "\"" + (more.empty() ? "" : ", " + more) + "}";
}

}  // namespace sorntest
