#include "tools/PutAndRemove.h"

#include <cstdio>

#include "rox/RoxMempool.h"
#include "sorn/dict/Dict.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sorn/rpc/RequestWrapper.h"
#include "tools/BusSession.h"
#include "tools/ExitCode.h"
#include "tools/LineReader.h"
#include "tools/MessageLine.h"
#include "tools/Output.h"
#include "tools/Words.h"
#include "vkbus/VkBus.h"

namespace sorn::tools {

namespace {

constexpr char actionHeaderG[] = "Action";  // of the development service

/// False and words when the service did not do it.
bool Tell(BusSession& session, RoxMempool* pool, uint32_t rpcId, const char* action, const std::string& line,
          std::string& words) {
    const int version = static_cast<int>(Schema::defaultSchemaVersionG);
    const ref<LazyDict> body = NewBody(pool, line, version, words);
    if (body == nullptr) return false;
    RoxString type;
    if (!body->GetTypeName(&type)) {
        words = "the record has no type";
        return false;
    }
    const ref<RequestWrapper> request =
        RequestWrapper::New(pool, rpcId, type, RequestWrapper::RESPONSE_COUNT_SINGLE, version, body, nullptr);
    request->AddOptionalHeader(actionHeaderG, action);
    const ref<ResponseWrapper> response = session.Exchange(request, words);
    if (response == nullptr) return false;
    const ref<Dict> answer = response->BodyToDict();
    if (answer->GetString("type", 0) != "error") return true;
    words = answer->GetString("text", 0).Utf8();
    return false;
}

bool TellAll(const PutAndRemoveOptions& options, LineReader& reader) {
    RoxMempool sessionPool("sorn put");
    BusSession session(&sessionPool, options.trace);
    std::string words;
    if (!session.Open(words)) {
        std::fprintf(stderr, "%s\n", words.c_str());
        return false;
    }
    bool isAllDone = true;
    std::string line;
    for (uint32_t number = 1; session.FOpen() && reader.ReadLine(line); ++number) {
        if (line.find_first_not_of(" \t\r") == std::string::npos) continue;
        if (Tell(session, &sessionPool, number, options.action, line, words)) continue;
        isAllDone = false;
        std::fprintf(stderr, "line %u: %s%s\n", number, LineOfWords(words).c_str(),
                     session.FOpen() ? "" : "; the rest was not sent");
    }
    if (reader.FFailed()) std::fprintf(stderr, "the input: %s\n", reader.FailureWords().c_str());
    return isAllDone && !reader.FFailed();
}

}  // namespace

int PutOrRemove(const PutAndRemoveOptions& options) {
    std::FILE* const in = OpenFile(options.inPath, "rbe", stdin);
    if (in == nullptr) return WRONG_USAGE;
    if (!options.bus.empty()) VkBusSetAddress(options.bus.c_str());
    LineReader reader(::fileno(in));
    const bool isAllDone = TellAll(options, reader);
    if (in != stdin) std::fclose(in);
    return isAllDone ? DONE : SOME_REFUSED;
}

}  // namespace sorn::tools
