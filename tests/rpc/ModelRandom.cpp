#include "rpc/ModelRandom.h"

#include "rpc/ModelWriter.h"

namespace sorntest {

namespace {

using namespace std::string_literals;

const std::vector<std::string> vKindsG = {"request", "requestUpdate", "response", "cancel"};
const std::vector<std::string> vCountsG = {"none", "single", "multiple"};
const std::vector<std::string> vTypesG = {"recordingSearch", "", "x", "\xC3\xA9t\xC3\xA9", "two words"};
const std::vector<uint32_t> vNumbersG = {0, 1, 7, 10, 42, 65536, 2147483648u, 4294967295u};
const std::vector<std::string> vNamesG = {"Accept",        "ZZ",           "a",    "Cookie", "X-\xC3\xA9",
                                          " lead",         "trail ",       "type", "RpcId",  "Type",
                                          "Content-Type",  "IsFinal",      "",     "B-",     "a\0b"s,
                                          "ResponseCount", "SchemaVersion"};
const std::vector<std::string> vValuesG = {"",
                                           "v",
                                           " padded\t",
                                           "\xC3\xBC",
                                           "a:b",
                                           "0",
                                           "\xFF\xC3",
                                           "x\0y"s,
                                           "long enough to be",
                                           "cancel",
                                           "7",
                                           "in\r\nside",
                                           "\xE2\x82\xAC \xF0\x9F\x98\x80"};
const std::vector<std::string> vBodiesG = {"{}",
                                           " {}",
                                           R"({"type": "recordingSearch", "count": 3})",
                                           "{\"a\": \"\xC3\xA9\xE2\x82\xAC\"}",
                                           "{\"a\": ",
                                           "{no JSON at all\r\n\r\n",
                                           "{\"a\": \"\xFF\"}",
                                           "{\"list\": [1, 2, {\"deep\": []}]}"};
const std::vector<std::string> vWordsG = {"\r\n",
                                          "\r\n\r\n",
                                          ":",
                                          " ",
                                          "\0"s,
                                          "\xC3\xA9",
                                          "\xE2\x82\xAC",
                                          "\xC3",
                                          "0",
                                          "9",
                                          "-",
                                          "RpcId: 9\r\n",
                                          "RpcId: 4294967296\r\n",
                                          "Type: cancel\r\n",
                                          "Type: response\r\n",
                                          "Type:\r\n",
                                          "Content-Type: text/plain\r\n",
                                          "Content-Type:\r\n",
                                          "ResponseCount: many\r\n",
                                          "SchemaVersion: 21\r\n",
                                          "IsFinal: true\r\n",
                                          "no colon\r\n",
                                          "ORPC/2 5 5\r\n",
                                          "{}"};

}  // namespace

ModelMessage ModelRandom::Message() {
    ModelMessage message;
    message.kind = OneOf(vKindsG);
    message.rpcId = Chance(70) ? vNumbersG[Below(vNumbersG.size())] : Below(UINT32_MAX);
    if (message.kind == "cancel") return message;
    message.body = OneOf(vBodiesG);
    message.contentType = "application/json";
    if (message.kind == "response") {
        message.isFinal = Chance(50);
        if (Chance(20)) message.contentType = "";
    } else {
        message.requestType = OneOf(vTypesG);
        message.responseCount = message.kind == "request" ? OneOf(vCountsG) : "multiple";
        if (message.kind == "request") message.version = vNumbersG[Below(vNumbersG.size())];
    }
    message.bodyVersion = message.version;
    for (unsigned n = Chance(50) ? Below(6) : 0; n != 0; --n) {
        message.optional[OneOf(vNamesG)].push_back(OneOf(vValuesG));
    }
    return message;
}

std::string ModelRandom::Damaged(std::string bytes) {
    for (unsigned n = 1 + Below(3); n != 0; --n) {
        const unsigned at = Below(bytes.size() + 1);
        const unsigned length = Below(std::min<size_t>(bytes.size() - at, 40) + 1);
        switch (Below(6)) {
            case 0:
                if (at < bytes.size()) bytes[at] = static_cast<char>(bytes[at] ^ (1 << Below(8)));
                break;
            case 1:
                if (at < bytes.size()) bytes[at] = static_cast<char>(Below(256));
                break;
            case 2:
                bytes.erase(at, length);
                break;
            case 3:
                bytes.insert(at, bytes.substr(at, length));
                break;
            default:
                bytes.insert(at, OneOf(vWordsG));
        }
    }
    return bytes;
}

std::string ModelRandom::DamagedMessage(const std::string& headerBlock, const std::string& body) {
    std::string headers = Chance(60) ? Damaged(headerBlock) : headerBlock;
    if (Chance(25)) {
        // A whole line taken out.
        const size_t begin = headers.find("\r\n", Below(headers.size() + 1));
        const size_t end = begin == std::string::npos ? begin : headers.find("\r\n", begin + 2);
        if (end != std::string::npos) headers.erase(begin, end - begin);
    }
    const std::string newBody = Chance(20) ? Damaged(body) : body;
    std::string bytes = ModelWriter::Frame(headers, newBody);
    if (Chance(20)) bytes += OneOf(vWordsG);
    if (Chance(10)) bytes = Damaged(bytes.substr(0, 20)) + bytes.substr(std::min<size_t>(bytes.size(), 20));
    if (Chance(5)) bytes.resize(Below(bytes.size() + 1));
    return bytes;
}

}  // namespace sorntest
