#pragma once

#include <string>

#include "rpc/ModelReader.h"

namespace sorntest {

/// Says, on its own, when a message of a stream is whole.
class ModelPacketizer {
 public:
    void Update(const std::string& input) {
        if (!isLineRead) {
            const bool isGood = ModelReader::ReadFirstLine(input, line, lastError);
            if (!isGood && line.length == 0) return;
            isLineRead = true;
            if (!isGood) {
                isComplete = true;
                length = static_cast<uint32_t>(input.size());
                return;
            }
            length = line.bodyLength + line.headerLength + line.length;
        }
        isComplete = length <= input.size();
    }
    void Reset() {
        isLineRead = false;
        isComplete = false;
        length = 0;
        line = ModelReader::Line();
    }

    bool isLineRead = false;
    bool isComplete = false;
    uint32_t length = 0;
    ModelReader::Line line;
    std::string lastError;
};

}  // namespace sorntest
