#pragma once

#include <string>

#include "rpc/ModelMessage.h"

namespace sorntest {

/// Writes messages, on its own: a second opinion of what the library writes.
class ModelWriter {
 public:
    static constexpr size_t maxBodyG = 5242880;
    static constexpr size_t maxHeadersG = 1048576;

    /// Appends the message, or words to `error` and false.
    static bool Write(const ModelMessage& message, std::string& out, std::string& error);
    /// All header lines and the empty line.
    static std::string HeaderBlock(const ModelMessage& message);
    /// A first line of these counts, the block and the body.
    static std::string Frame(const std::string& headerBlock, const std::string& body);
};

}  // namespace sorntest
