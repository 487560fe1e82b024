#include "rpc/ModelMessage.h"

namespace sorntest {

std::string ModelMessage::Describe() const {
    std::string text = kind + " " + std::to_string(rpcId);
    if (kind == "cancel") return text;
    text += ", version " + std::to_string(version) + ", body's " + std::to_string(bodyVersion);
    if (kind == "response") {
        text += isFinal ? ", final" : ", not final";
    } else {
        text += ", of '" + requestType + "', " + responseCount;
    }
    text += ", content '" + contentType + "'\n";
    for (const auto& [name, vValues] : optional) {
        for (const std::string& value : vValues) text += "'" + name + "' = '" + value + "'\n";
    }
    return text + body;
}

}  // namespace sorntest
