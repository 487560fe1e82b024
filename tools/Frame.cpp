#include "tools/Frame.h"

#include <cstdio>

#include "rox/RoxMempool.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "tools/ExitCode.h"
#include "tools/LineReader.h"
#include "tools/MessageLine.h"
#include "tools/Output.h"

namespace sorn::tools {

namespace {

/// False and words when the message is too large.
bool WriteMessage(const ref<OrvoRpcWrapper>& message, RoxMempool* pool, std::string& words) {
    ByteBuffer bytes(pool);
    RoxString error;
    if (!OrvoRpcV2::MarshalToString(message, bytes, error, pool, false)) {
        words = error.Utf8();
        return false;
    }
    std::fwrite(bytes.GetData(), 1, bytes.GetLength(), stdout);
    return true;
}

/// Adds the headers of the options; false and words for one that cannot be.
template <class Wrapper>
bool AddHeaders(const FrameOptions& options, Wrapper& message, std::string& words) {
    for (const std::string& header : options.vHeaders) {
        const size_t equals = header.find('=');
        const std::string name = header.substr(0, equals);
        if (equals == std::string::npos || name.empty() ||
            header.find_first_of("\r\n") != std::string::npos || name.find(':') != std::string::npos) {
            words = "--header: not NAME=VALUE on one line: " + header;
            return false;
        }
        if (!message.AddOptionalHeader(name.c_str(), header.substr(equals + 1).c_str())) {
            words = "--header: the name is reserved: " + name;
            return false;
        }
    }
    return true;
}

/// Null and words when the options do not fit each other or the body.
ref<OrvoRpcWrapper> NewMessage(const FrameOptions& options, RoxMempool* pool, const std::string& bodyText,
                               std::string& words) {
    if (options.kind == "cancel") return CancelWrapper::New(pool, options.rpcId, nullptr);
    const int version = options.schemaVersion >= 0  ? options.schemaVersion
                        : options.kind == "request" ? static_cast<int>(Schema::defaultSchemaVersionG)
                                                    : 0;
    const ref<LazyDict> body = NewBody(pool, bodyText, version, words);
    if (body == nullptr) return nullptr;
    if (options.kind == "response") {
        const ref<ResponseWrapper> response =
            ResponseWrapper::New(pool, options.rpcId, options.isFinal, body, nullptr);
        return AddHeaders(options, *response, words) ? ref<OrvoRpcWrapper>(response) : nullptr;
    }
    RoxString requestType(options.requestType.c_str());
    if (requestType.FEmpty() && !body->GetTypeName(&requestType)) {
        words = "the body has no type; --request-type gives one";
        return nullptr;
    }
    if (!FOneLine(requestType.View())) {
        words = "the type of the body is not on one line";
        return nullptr;
    }
    ref<RequestWrapper> request;
    if (options.kind == "request") {
        RequestWrapper::ResponseCount count = RequestWrapper::RESPONSE_COUNT_SINGLE;
        RequestWrapper::ParseResponseCount(options.count, count);
        request = RequestWrapper::New(pool, options.rpcId, requestType, count, version, body, nullptr);
    } else {
        request = RequestUpdateWrapper::New(pool, options.rpcId, requestType, body, nullptr);
    }
    return AddHeaders(options, *request, words) ? ref<OrvoRpcWrapper>(request) : nullptr;
}

/// The text of a file as a body: without what editors put around it.
std::string BodyOfFile(const std::string& text) {
    const size_t begin = text.find_first_not_of(" \t\r\n");
    if (begin == std::string::npos) return "";
    return text.substr(begin, text.find_last_not_of("\r\n") - begin + 1);
}

bool FrameOne(const FrameOptions& options, std::FILE* in, std::string& words) {
    std::string text;
    LineReader reader(::fileno(in));
    if (options.kind != "cancel" && !reader.ReadAll(text)) {
        words = "the input could not be read";
        return false;
    }
    RoxMempool pool("sorn frame");
    const ref<OrvoRpcWrapper> message = NewMessage(options, &pool, BodyOfFile(text), words);
    return message != nullptr && WriteMessage(message, &pool, words);
}

bool FrameLine(const std::string& line, std::string& words) {
    RoxMempool pool("sorn frame");
    const ref<OrvoRpcWrapper> message = ReadMessageLine(&pool, line, words);
    return message != nullptr && WriteMessage(message, &pool, words);
}

/// False when a line was refused.
bool FrameLines(std::FILE* in) {
    LineReader reader(::fileno(in));
    bool isAllDone = true;
    std::string line;
    std::string words;
    for (unsigned long number = 1;; ++number) {
        if (!reader.FLineReady()) std::fflush(stdout);
        if (!reader.ReadLine(line)) break;
        if (FrameLine(line, words)) continue;
        isAllDone = false;
        std::fprintf(stderr, "line %lu: %s\n", number, words.c_str());
    }
    if (reader.FFailed()) std::fputs("the input could not be read\n", stderr);
    return isAllDone && !reader.FFailed();
}

/// Words about options that do not go together, or null.
const char* CheckOptions(const FrameOptions& options) {
    const bool isRequest = options.kind == "request";
    const bool isUpdate = options.kind == "requestUpdate";
    if (options.lines) return options.kind.empty() ? nullptr : "--lines: the lines tell the kind";
    if (options.kind.empty()) return "the kind of message is missing";
    if (!options.hasRpcId) return "--rpc-id is required";
    if (!options.requestType.empty() && !isRequest && !isUpdate)
        return "--request-type is for requests and updates";
    if (!options.count.empty() && !isRequest && !(isUpdate && options.count == "multiple")) {
        return "--count is for requests";
    }
    if (options.isFinal && options.kind != "response") return "--final is for responses";
    if (options.kind != "cancel") return nullptr;
    if (!options.vHeaders.empty() || options.schemaVersion >= 0 || !options.inPath.empty()) {
        return "a cancel has neither headers nor version nor body";
    }
    return nullptr;
}

}  // namespace

int Frame(const FrameOptions& options) {
    if (const char* words = CheckOptions(options)) {
        std::fprintf(stderr, "%s\n", words);
        return WRONG_USAGE;
    }
    std::FILE* const in = OpenFile(options.inPath, "rbe", stdin);
    if (in == nullptr) return WRONG_USAGE;
    std::string words;
    const bool isDone = options.lines ? FrameLines(in) : FrameOne(options, in, words);
    if (!words.empty()) std::fprintf(stderr, "%s\n", words.c_str());
    if (in != stdin) std::fclose(in);
    return FinishOutput(stdout) && isDone ? DONE : SOME_REFUSED;
}

}  // namespace sorn::tools
