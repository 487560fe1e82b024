#include "tools/Send.h"

#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <mutex>

#include "client/VkLocalorvoClient.h"
#include "rox/RoxInitInfo.h"
#include "rox/RoxMempool.h"
#include "rox/RoxThread.h"
#include "sorn/model/Schema.h"
#include "sornschema/Error.h"
#include "tools/ExitCode.h"
#include "tools/Interrupt.h"
#include "tools/LineReader.h"
#include "tools/Output.h"
#include "tools/RecordForms.h"
#include "tools/Trace.h"
#include "tools/Words.h"
#include "vkbus/VkBus.h"

namespace sorn::tools {

namespace {

constexpr long long lookMillisecondsG = 50;

/// Standard output, and whether it has everything so far.
struct Responses {
    int descriptor;
    bool isWhole = true;
};

/// What a callback leaves for the tool.
struct Watched {
    Responses& responses;
    std::mutex mutex;
    bool isFinal = false;
};

/// Writes a body on one line at once, so that whoever reads along has it; nothing behind one that was cut.
void WriteBody(const char* json, Responses& responses) {
    std::string line(json);
    std::replace_if(
        line.begin(), line.end(), [](char c) { return c == '\n' || c == '\r'; }, ' ');
    line += '\n';
    if (responses.isWhole) responses.isWhole = WriteUnlessInterrupted(responses.descriptor, line);
}

void OnResponse(unsigned, bool isFinal, const char* json, void* context) {
    auto* const watched = static_cast<Watched*>(context);
    const std::lock_guard<std::mutex> lock(watched->mutex);
    WriteBody(json, watched->responses);
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
        words = "the input: " + reader.FailureWords();
    } else {
        object = ReadRecord(form, pool, text, words);
    }
    if (object == nullptr) std::fprintf(stderr, "%s\n", LineOfWords(words).c_str());
    if (in != stdin) std::fclose(in);
    return object;
}

int Wait(VkLocalorvoClient& client, SornObject* request, Responses& responses) {
    ref<LazyDict> response;
    if (!client.SendRequestSync(request, response) || response == nullptr) {
        std::fputs("no response\n", stderr);
        return SOME_REFUSED;
    }
    WriteBody(response->ToJson(false).Utf8(), responses);
    unsigned structId = 0;
    return response->GetType(&structId) && structId == sornschema::Error::structIdG ? SOME_REFUSED : DONE;
}

int Watch(VkLocalorvoClient& client, SornObject* request, Responses& responses) {
    Watched watched{responses, {}};
    unsigned rpcId = 0;
    CatchInterrupts();
    if (!client.SendRequestAsync(request, true, &OnResponse, &watched, rpcId)) {
        std::fputs("the request could not be sent\n", stderr);
        return SOME_REFUSED;
    }
    while (!FInterrupted() && client.FPending(rpcId)) RoxThread::SleepMilliseconds(lookMillisecondsG);
    client.CancelRequest(rpcId);
    RoxInitInfo::StopAll();  // no callback runs any more
    const std::lock_guard<std::mutex> lock(watched.mutex);
    if (FInterrupted() || watched.isFinal) return DONE;
    std::fputs("the connection is lost\n", stderr);
    return SOME_REFUSED;
}

int SendThrough(VkLocalorvoClient& client, const SendOptions& options, SornObject* request,
                Responses& responses) {
    if (options.trace) VkLocalorvoClient::SetObserver(&TraceMessage);
    switch (options.way) {
        case SendOptions::WAIT:
            return Wait(client, request, responses);
        case SendOptions::WATCH:
            return Watch(client, request, responses);
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
    Responses responses{::fileno(out)};
    {
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        code = SendThrough(*client, options, request.get(), responses);
    }
    RoxInitInfo::StopAll();
    std::fclose(out);
    if (responses.isWhole) return code;
    WriteUnlessInterrupted(STDERR_FILENO, "the output could not be written\n");
    return SOME_REFUSED;
}

}  // namespace sorn::tools
