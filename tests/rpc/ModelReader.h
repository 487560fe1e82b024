#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "rpc/ModelMessage.h"

namespace sorntest {

/// Reads messages, on its own: a second opinion of what the library reads.
class ModelReader {
 public:
    /// The lengths of a first line, as they stood before where nothing was read.
    struct Line {
        uint32_t headerLength = 0;
        uint32_t bodyLength = 0;
        uint32_t length = 0;
    };
    static bool ReadFirstLine(const std::string& input, Line& line, std::string& error);

    /// Whether a body is JSON text, with words if not: the readers of JSON have their own tests.
    using IsJson = std::function<bool(const std::string& body, std::string& words)>;

    /// `isJson` is null when bodies are not to be looked at.
    explicit ModelReader(IsJson isJson = nullptr) : isJsonM(std::move(isJson)) {}

    bool Read(const std::string& input, ModelMessage& message, std::string& error);

 private:
    bool Split(const std::string& input, std::string& headers, std::string& error);
    bool ReadHeaders(const std::string& headers, std::string& error);
    bool ReadBody(std::string& error);
    bool ReadKind(std::string& error);
    bool FHas(const std::string& name) const { return headersM.count(name) != 0; }
    std::string First(const std::string& name) const { return FHas(name) ? headersM.at(name)[0] : ""; }

    IsJson isJsonM;
    ModelHeaders headersM;
    ModelMessage messageM;
};

}  // namespace sorntest
