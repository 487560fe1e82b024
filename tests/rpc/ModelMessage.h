#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace sorntest {

/// The values of each name, by name in the order of bytes.
using ModelHeaders = std::map<std::string, std::vector<std::string>>;

/// One message, told without anything of the library: what a wrapper says of it.
struct ModelMessage {
    std::string kind;  ///< the word on the wire: "request", "requestUpdate", "response" or "cancel"
    uint32_t rpcId = 0;
    uint32_t version = 0;       ///< the message's
    uint32_t bodyVersion = 0;   ///< its body's
    std::string requestType;    ///< of requests and updates
    std::string responseCount;  ///< the word, of requests and updates
    bool isFinal = false;       ///< of responses
    std::string contentType;    ///< of all but cancels
    ModelHeaders optional;      ///< of all but cancels
    std::string body;           ///< its text

    /// All of it on lines, for comparisons.
    std::string Describe() const;
};

}  // namespace sorntest
