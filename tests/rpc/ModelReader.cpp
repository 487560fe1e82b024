#include "rpc/ModelReader.h"

#include <sys/types.h>

#include <cstdio>

#include "rpc/ModelText.h"
#include "rpc/ModelWriter.h"

namespace sorntest {

namespace {

bool Fail(std::string& error, const std::string& words) {
    error = words;
    return false;
}

bool ReadLength(const std::string& field, size_t limit, const std::string& what, uint32_t& length,
                std::string& error) {
    ssize_t value = 0;
    if (sscanf(field.c_str(), "%zd", &value) != 1) {
        return Fail(error, "Invalid " + what + " length - not a number");
    }
    if (static_cast<size_t>(value) > limit) return Fail(error, "Declared " + what + " length too long");
    length = static_cast<uint32_t>(value);
    return true;
}

}  // namespace

bool ModelReader::ReadFirstLine(const std::string& input, Line& line, std::string& error) {
    const size_t end = input.find("\r\n");
    if (end == std::string::npos) {
        line.length = 0;
        if (input.size() < 26) return false;
        error = "First line too long";
        line.length = static_cast<uint32_t>(input.size());
        return true;
    }
    line.length = static_cast<uint32_t>(end + 2);
    const std::vector<std::string> vFields = ModelSplit(ModelTrim(input.substr(0, end)), " ");
    if (vFields.size() != 3) return Fail(error, "First line does not have expected number of fields (3)");
    if (vFields[0] != "ORPC/2") return Fail(error, "First line of message does not start with 'ORPC/2'");
    return ReadLength(vFields[1], ModelWriter::maxHeadersG, "header", line.headerLength, error) &&
           ReadLength(vFields[2], ModelWriter::maxBodyG, "body", line.bodyLength, error);
}

bool ModelReader::Split(const std::string& input, std::string& headers, std::string& error) {
    Line line;
    if (!ReadFirstLine(input, line, error)) return false;
    const auto sizeWords = [](const char* what, size_t found, uint32_t expected) {
        return std::string("Size of ") + what + " (" + std::to_string(found) + ") does not match expected (" +
               std::to_string(expected) + ")";
    };
    const size_t headersAt = ModelAdvance(input, 0, line.length);
    const size_t bodyAt = ModelAdvance(input, headersAt, line.headerLength);
    headers = input.substr(headersAt, bodyAt - headersAt);
    if (headers.size() != line.headerLength) {
        return Fail(error, sizeWords("header", headers.size(), line.headerLength));
    }
    messageM.body = input.substr(bodyAt, ModelAdvance(input, bodyAt, line.bodyLength) - bodyAt);
    if (messageM.body.size() != line.bodyLength) {
        return Fail(error, sizeWords("body", messageM.body.size(), line.bodyLength));
    }
    return true;
}

bool ModelReader::ReadHeaders(const std::string& headers, std::string& error) {
    const std::vector<std::string> vLines = ModelSplit(headers, "\r\n");
    if (vLines.size() > 65535) return Fail(error, "Too many header lines");
    for (const std::string& line : vLines) {
        if (line.empty()) continue;
        const size_t colon = line.find(':');
        if (colon == std::string::npos) {
            error += "Invalid header line: " + ModelPrinted(line);
            return false;
        }
        headersM[line.substr(0, colon)].push_back(ModelTrim(line.substr(colon + 1)));
    }
    if (!FHas("RpcId")) return Fail(error, "Missing rpcId");
    messageM.contentType = First("Content-Type");
    if (!messageM.contentType.empty() && messageM.contentType != "application/json") {
        return Fail(error, "Unsupported Content-Type: '" + ModelPrinted(messageM.contentType) + "'");
    }
    messageM.rpcId = ModelNumber(First("RpcId"));
    messageM.bodyVersion = ModelNumber(First("SchemaVersion"));
    messageM.version = messageM.bodyVersion;
    return true;
}

bool ModelReader::ReadBody(std::string& error) {
    if (messageM.body.empty()) return Fail(error, "Missing message body");
    if (isJsonM == nullptr) {
        // A lazy body cannot open with a NUL.
        return messageM.body[0] != '\0' || Fail(error, "Missing message body");
    }
    std::string words;
    return isJsonM(messageM.body, words) || Fail(error, "Cannot convert JSON to Dict: " + words);
}

bool ModelReader::ReadKind(std::string& error) {
    const std::string type = First("Type");
    messageM.kind = type;
    if (type == "request") {
        const std::string count = First("ResponseCount");
        if (!FHas("ResponseCount")) return Fail(error, "Missing ResponseCount in request");
        if (count != "none" && count != "single" && count != "multiple") {
            return Fail(error, "Invalid value for ResponseCount header");
        }
        if (!FHas("RequestType")) return Fail(error, "Missing RequestType in request");
        messageM.responseCount = count;
    } else if (type == "requestUpdate") {
        if (!FHas("RequestType")) return Fail(error, "Missing RequestType header.");
        messageM.responseCount = "multiple";
        messageM.version = 0;
    } else if (type == "cancel") {
        return messageM.body.empty() || Fail(error, "'cancel' should not have a body");
    } else if (type.empty()) {
        return Fail(error, "Missing 'Type' header");
    } else if (type != "response") {
        return Fail(error, "Error in unmarshalling : Unknown Type: " + ModelPrinted(type));
    }
    if (!ReadBody(error)) return false;

    messageM.optional = headersM;
    if (type == "response") {
        messageM.isFinal = First("IsFinal") == "true";
        for (const char* name : {"IsFinal", "Type", "RpcId", "Content-Type"}) messageM.optional.erase(name);
        return true;
    }
    messageM.requestType = First("RequestType");
    for (const char* name :
         {"RequestType", "SchemaVersion", "ResponseCount", "Type", "type", "RpcId", "Content-Type"}) {
        messageM.optional.erase(name);
    }
    return true;
}

bool ModelReader::Read(const std::string& input, ModelMessage& message, std::string& error) {
    headersM.clear();
    messageM = ModelMessage();
    std::string headers;
    if (!Split(input, headers, error) || !ReadHeaders(headers, error) || !ReadKind(error)) return false;
    message = messageM;
    return true;
}

}  // namespace sorntest
