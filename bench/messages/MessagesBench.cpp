// Messages: the framing of a large lazy body against two copies of the same bytes, and small messages against
// JSON-RPC 2.0 messages of the same content with nlohmann-json. A body stays text with us, as in a program
// that hands it on; the peer's is a tree that is ready when its message is built. Rates are in bytes of our
// messages on both sides, so that ratios are those of messages.
#include <benchmark/benchmark.h>

#include <cstring>
#include <functional>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "rox/RoxMempool.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace {

using benchmark::State;
using nlohmann::json;
using sorn::OrvoRpcV2;
using sorn::OrvoRpcWrapper;

constexpr unsigned rpcIdG = 7;
constexpr int versionG = 42;

template <class Work>
void Measure(State& state, size_t nBytes, Work work) {
    for (auto _ : state) {
        if (!work()) state.SkipWithError("a message was refused");
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * static_cast<int64_t>(nBytes));
}

ref<sorn::LazyDict> BodyOf(RoxMempool* pool, const std::string& text) {
    return sorn::LazyDict::FromJsonString(pool, text.c_str(), versionG);
}

ref<OrvoRpcWrapper> NewRequest(RoxMempool* pool, const ref<sorn::LazyDict>& body) {
    return sorn::RequestWrapper::New(pool, rpcIdG, "recordingSearch",
                                     sorn::RequestWrapper::RESPONSE_COUNT_SINGLE, versionG, body, nullptr);
}

ref<OrvoRpcWrapper> NewResponse(RoxMempool* pool, const ref<sorn::LazyDict>& body) {
    return sorn::ResponseWrapper::New(pool, rpcIdG, true, body, nullptr);
}

RoxString TextOf(RoxMempool* pool, const ref<OrvoRpcWrapper>& message) {
    return OrvoRpcV2::MarshalToString(pool, message, false);
}

/// A record of about n bytes whose field is one text, with what a body may have in it.
std::string BodyText(const char* type, size_t n) {
    std::string text = std::string("{\"type\":\"") + type + "\",\"note\":[";
    for (size_t i = 0; text.size() + 40 < n; ++i) {
        text +=
            (i == 0 ? "" : ",") + std::string("{\"id\":\"vuka:rc.") + std::to_string(i) + "\",\"n\":true}";
    }
    return text + "]}";
}

void RegisterFraming() {
    static const std::string body = BodyText("recordingList", 64 * 1024);
    benchmark::RegisterBenchmark("frame and unframe/64 KiB body/sorn", [](State& state) {
        RoxMempool pool("bench");
        const ref<sorn::LazyDict> lazy = BodyOf(&pool, body);
        const size_t nBytes = TextOf(&pool, NewResponse(&pool, lazy)).NByte();
        Measure(state, nBytes, [&] {
            RoxString error;
            const RoxString text = TextOf(&pool, NewResponse(&pool, lazy));
            return OrvoRpcV2::UnmarshalFromString(&pool, text, false, error) != nullptr;
        });
    });
    benchmark::RegisterBenchmark("frame and unframe/64 KiB body/two copies", [](State& state) {
        RoxMempool pool("bench");
        const RoxString text = TextOf(&pool, NewResponse(&pool, BodyOf(&pool, body)));
        std::vector<char> first(text.NByte());
        std::vector<char> second(text.NByte());
        Measure(state, text.NByte(), [&] {
            memcpy(first.data(), text.Utf8(), first.size());
            benchmark::DoNotOptimize(first.data());
            benchmark::ClobberMemory();
            memcpy(second.data(), first.data(), second.size());
            benchmark::DoNotOptimize(second.data());
            benchmark::ClobberMemory();
            return true;
        });
    });
}

/// One small message in both libraries.
struct Small {
    std::string data;  ///< its name in the table
    std::function<ref<OrvoRpcWrapper>(RoxMempool*, const ref<sorn::LazyDict>&)> make;
    std::string body;  ///< empty: none
    std::function<json(const json& body)> makeJson;
};

const std::vector<Small>& SmallMessages() {
    static const std::vector<Small> messages = {
        {"cancel",
         [](RoxMempool* pool, const ref<sorn::LazyDict>&) -> ref<OrvoRpcWrapper> {
             return sorn::CancelWrapper::New(pool, rpcIdG, nullptr);
         },
         "",
         [](const json&) {
             return json{{"jsonrpc", "2.0"}, {"method", "cancel"}, {"params", {{"rpcId", rpcIdG}}}};
         }},
        {"request", NewRequest, BodyText("recordingSearch", 200),
         [](const json& body) {
             return json{
                 {"jsonrpc", "2.0"},
                 {"id", rpcIdG},
                 {"method", "recordingSearch"},
                 {"params", {{"responseCount", "single"}, {"schemaVersion", versionG}, {"body", body}}}};
         }},
        {"response", NewResponse, BodyText("recordingList", 1024),
         [](const json& body) {
             return json{{"jsonrpc", "2.0"}, {"id", rpcIdG}, {"result", {{"isFinal", true}, {"body", body}}}};
         }},
    };
    return messages;
}

void RegisterSorn(const Small& small) {
    const auto name = [&small](const char* work) { return std::string(work) + "/" + small.data + "/sorn"; };
    benchmark::RegisterBenchmark(name("write message").c_str(), [&small](State& state) {
        RoxMempool pool("bench");
        const ref<sorn::LazyDict> body = small.body.empty() ? nullptr : BodyOf(&pool, small.body);
        Measure(state, TextOf(&pool, small.make(&pool, body)).NByte(),
                [&] { return !TextOf(&pool, small.make(&pool, body)).FEmpty(); });
    });
    benchmark::RegisterBenchmark(name("read message").c_str(), [&small](State& state) {
        RoxMempool pool("bench");
        const ref<sorn::LazyDict> body = small.body.empty() ? nullptr : BodyOf(&pool, small.body);
        const RoxString text = TextOf(&pool, small.make(&pool, body));
        Measure(state, text.NByte(), [&] {
            RoxString error;
            return OrvoRpcV2::UnmarshalFromString(&pool, text, false, error) != nullptr;
        });
    });
}

void RegisterPeer(const Small& small) {
    const auto name = [&small](const char* work) {
        return std::string(work) + "/" + small.data + "/nlohmann-json";
    };
    static RoxMempool pool("bench");
    const size_t nBytes =
        TextOf(&pool, small.make(&pool, small.body.empty() ? nullptr : BodyOf(&pool, small.body))).NByte();
    benchmark::RegisterBenchmark(name("write message").c_str(), [&small, nBytes](State& state) {
        const json body = small.body.empty() ? json() : json::parse(small.body);
        Measure(state, nBytes, [&] { return !small.makeJson(body).dump().empty(); });
    });
    benchmark::RegisterBenchmark(name("read message").c_str(), [&small, nBytes](State& state) {
        const std::string text = small.makeJson(small.body.empty() ? json() : json::parse(small.body)).dump();
        Measure(state, nBytes, [&] {
            const json message = json::parse(text, nullptr, false);
            return message.value("jsonrpc", "") == "2.0";
        });
    });
}

}  // namespace

int main(int argc, char** argv) {
    RegisterFraming();
    for (const Small& small : SmallMessages()) {
        RegisterSorn(small);
        RegisterPeer(small);
    }
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
