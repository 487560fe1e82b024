#include "rpc/ModelWriter.h"

namespace sorntest {

std::string ModelWriter::HeaderBlock(const ModelMessage& message) {
    ModelHeaders headers;
    const auto add = [&headers](const std::string& name, const std::string& value) {
        headers[name].push_back(value);
    };
    const bool isRequest = message.kind == "request" || message.kind == "requestUpdate";
    add("Type", message.kind);
    add("RpcId", std::to_string(message.rpcId));
    if (isRequest) {
        add("SchemaVersion", std::to_string(message.version));
        add("ResponseCount", message.responseCount);
        add("Content-Type", "application/json");
        add("RequestType", message.requestType);
    }
    if (message.kind == "response") {
        add("IsFinal", message.isFinal ? "true" : "false");
        add("Content-Type", message.contentType);
    }
    if (message.kind != "cancel") {
        for (const auto& [name, vValues] : message.optional) {
            for (const std::string& value : vValues) add(name, value);
        }
    }
    // An update says so and nothing else, whatever came with it.
    if (message.kind == "requestUpdate") headers["Type"] = {"requestUpdate"};

    std::string block;
    for (const auto& [name, vValues] : headers) {
        for (const std::string& value : vValues) block += name + ": " + value + "\r\n";
    }
    return block + "\r\n";
}

std::string ModelWriter::Frame(const std::string& headerBlock, const std::string& body) {
    return "ORPC/2 " + std::to_string(headerBlock.size()) + " " + std::to_string(body.size()) + "\r\n" +
           headerBlock + body;
}

bool ModelWriter::Write(const ModelMessage& message, std::string& out, std::string& error) {
    if (message.body.size() > maxBodyG) {
        error += "Orvo Rpc message body is too large.";
        return false;
    }
    const std::string block = HeaderBlock(message);
    if (block.size() > maxHeadersG) {
        error += "Orvo Rpc headers are too large";
        return false;
    }
    out += Frame(block, message.body);
    return true;
}

}  // namespace sorntest
