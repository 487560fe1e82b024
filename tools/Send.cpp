#include "tools/Send.h"

#include <algorithm>
#include <atomic>
#include <csignal>
#include <cstdio>
#include <mutex>

#include "client/VkLocalorvoClient.h"
#include "rox/RoxInitInfo.h"
#include "rox/RoxMempool.h"
#include "rox/RoxThread.h"
#include "sorn/model/Schema.h"
#include "sornschema/Error.h"
#include "tools/ExitCode.h"
#include "tools/LineReader.h"
#include "tools/Output.h"
#include "tools/RecordForms.h"
#include "tools/Trace.h"
#include "vkbus/VkBus.h"

namespace sorn::tools {

namespace {

constexpr long long lookMillisecondsG = 50;

std::atomic<bool> isInterruptedG{false};

/// What a callback leaves for the tool.
struct Watched {
    std::FILE* out;
    std::mutex mutex;
    bool isFinal = false;
};

/// Writes a body on one line at once, so that whoever reads along has it.
void WriteBody(const char* json, std::FILE* out) {
    std::string line(json);
    std::replace_if(
        line.begin(), line.end(), [](char c) { return c == '\n' || c == '\r'; }, ' ');
    std::fprintf(out, "%s\n", line.c_str());
    std::fflush(out);
}

void OnResponse(unsigned, bool isFinal, const char* json, void* context) {
    auto* const watched = static_cast<Watched*>(context);
    const std::lock_guard<std::mutex> lock(watched->mutex);
    WriteBody(json, watched->out);
    watched->isFinal = watched->isFinal || isFinal;
}

ref<SornObject> ReadRequest(const SendOptions& options, RoxMempool* pool) {
    std::FILE* const in = OpenFile(options.inPath, "rbe", stdin);
    if (in == nullptr) return nullptr;
    std::string text;
    std::string words;
    LineReader reader(::fileno(in));
    ConvertOptions form;
    form.schemaVersion = static_cast<int>(Schema::defaultSchemaVersionG);
    ref<SornObject> object;
    if (!reader.ReadAll(text)) {
        words = "the input could not be read";
    } else {
        object = ReadRecord(form, pool, text, words);
    }
    if (object == nullptr) std::fprintf(stderr, "%s\n", words.c_str());
    if (in != stdin) std::fclose(in);
    return object;
}

int Wait(VkLocalorvoClient& client, SornObject* request, std::FILE* out) {
    ref<LazyDict> response;
    if (!client.SendRequestSync(request, response) || response == nullptr) {
        std::fputs("no response\n", stderr);
        return SOME_REFUSED;
    }
    WriteBody(response->ToJson(false).Utf8(), out);
    unsigned structId = 0;
    return response->GetType(&structId) && structId == sornschema::Error::structIdG ? SOME_REFUSED : DONE;
}

int Watch(VkLocalorvoClient& client, SornObject* request, std::FILE* out) {
    Watched watched;
    watched.out = out;
    unsigned rpcId = 0;
    std::signal(SIGINT, [](int) { isInterruptedG = true; });
    std::signal(SIGTERM, [](int) { isInterruptedG = true; });
    if (!client.SendRequestAsync(request, true, &OnResponse, &watched, rpcId)) {
        std::fputs("the request could not be sent\n", stderr);
        return SOME_REFUSED;
    }
    while (!isInterruptedG && client.FPending(rpcId)) RoxThread::SleepMilliseconds(lookMillisecondsG);
    client.CancelRequest(rpcId);
    RoxInitInfo::StopAll();  // no callback runs any more
    const std::lock_guard<std::mutex> lock(watched.mutex);
    if (isInterruptedG || watched.isFinal) return DONE;
    std::fputs("the connection is lost\n", stderr);
    return SOME_REFUSED;
}

int SendThrough(VkLocalorvoClient& client, const SendOptions& options, SornObject* request, std::FILE* out) {
    if (options.trace) VkLocalorvoClient::SetObserver(&TraceMessage);
    switch (options.way) {
        case SendOptions::WAIT:
            return Wait(client, request, out);
        case SendOptions::WATCH:
            return Watch(client, request, out);
        case SendOptions::FORGET:
            break;
    }
    if (client.SendRequestAndForget(request)) return DONE;
    std::fputs("the request could not be sent\n", stderr);
    return SOME_REFUSED;
}

}  // namespace

int Send(const SendOptions& options) {
    RoxMempool pool("sorn send");
    const ref<SornObject> request = ReadRequest(options, &pool);
    if (request == nullptr) return options.inPath.empty() ? SOME_REFUSED : WRONG_USAGE;
    std::FILE* const out = TakeStandardOutput();
    if (out == nullptr) return SOME_REFUSED;
    if (!options.bus.empty()) VkBusSetAddress(options.bus.c_str());
    RoxInitInfo::StartAll(&pool);
    int code = SOME_REFUSED;
    {
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        code = SendThrough(*client, options, request.get(), out);
    }
    RoxInitInfo::StopAll();
    const bool isWritten = FinishOutput(out);
    std::fclose(out);
    return isWritten ? code : SOME_REFUSED;
}

}  // namespace sorn::tools
