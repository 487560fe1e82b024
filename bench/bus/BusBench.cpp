// The road over the bus, from a typed request to the text of its response: our client, bus and messages
// against a gRPC call with the same bytes and against the bare socket with them. All services are threads of
// this process.
//
// "round trip" is the time of one call; the counters p50 and p99 are in microseconds, and the processor time
// is that of both ends, since ours look for a while before they sleep, as BusPatience tells, and the bare
// socket's do not. "stream" is the time of a delivered response when one change goes to as many streams, one
// response each.
#include <benchmark/benchmark.h>
#include <stdlib.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <string>
#include <vector>

#include "bus/EchoService.h"
#include "bus/Peers.h"
#include "client/VkLocalorvoClient.h"
#include "rox/RoxMempool.h"
#include "sornschema/RecordingSearch.h"
#include "vkbus/VkBus.h"

namespace {

using benchmark::State;
using Clock = std::chrono::steady_clock;

/// The time of each call, and its median and 99th percentile. The first one, which finds its memory and
/// connects, does not count.
template <class Call>
void MeasureCalls(State& state, size_t nBytes, Call call) {
    std::vector<double> vMicroseconds;
    if (!call()) state.SkipWithError("the first call failed");
    for (auto _ : state) {
        const Clock::time_point start = Clock::now();
        if (!call()) {
            state.SkipWithError("a call failed");
            break;
        }
        vMicroseconds.push_back(std::chrono::duration<double, std::micro>(Clock::now() - start).count());
    }
    if (vMicroseconds.empty()) return;
    std::sort(vMicroseconds.begin(), vMicroseconds.end());
    state.counters["p50"] = vMicroseconds[vMicroseconds.size() / 2];
    state.counters["p99"] = vMicroseconds[vMicroseconds.size() * 99 / 100];
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(nBytes));
}

/// A folder of its own for sockets.
const std::string& Folder() {
    static const std::string folder = [] {
        char path[] = "/tmp/sorn-bench-XXXXXX";
        return std::string(mkdtemp(path));
    }();
    return folder;
}

/// The client with a service of ours at the other end.
class Road {
 public:
    Road() : poolM("bench"), serviceM(Folder() + "/bus") {
        VkLocalorvoClient::Create(&poolM);
        clientM = VkLocalorvoClient::Get();
    }
    ~Road() {
        clientM = nullptr;
        VkLocalorvoClient::Destroy();
    }
    VkLocalorvoClient& Client() { return *clientM; }
    bench::EchoService& Service() { return serviceM; }
    RoxMempool* Pool() { return &poolM; }

 private:
    RoxMempool poolM;
    bench::EchoService serviceM;
    ref<VkLocalorvoClient> clientM;
};

/// A request with a body of about n bytes.
ref<sornschema::RecordingSearch> NewSearch(RoxMempool* pool, size_t n) {
    const ref<sornschema::RecordingSearch> search(new (pool) sornschema::RecordingSearch);
    search->keyword = std::string(n - std::min<size_t>(n, 50), 'x').c_str();
    search->keyword_isSet = 1;
    return search;
}

template <class Benchmark>
void Register(const std::string& name, Benchmark work) {
    benchmark::RegisterBenchmark(name.c_str(), work)->MeasureProcessCPUTime()->UseRealTime();
}

void RegisterRoundTrip(const char* data, size_t nBytes, bool withGrpc) {
    const std::string name = std::string("round trip/") + data + "/";
    Register(name + "sorn", [nBytes](State& state) {
        Road road;
        const ref<sornschema::RecordingSearch> search = NewSearch(road.Pool(), nBytes);
        MeasureCalls(state, nBytes, [&] {
            ref<sorn::LazyDict> response;
            return road.Client().SendRequestSync(search.get(), response) && response != nullptr;
        });
    });
    Register(name + "bare socket", [nBytes](State& state) {
        bench::SocketEcho echo(nBytes);
        MeasureCalls(state, nBytes, [&] { return echo.Ask(); });
    });
    if (!withGrpc) return;
    Register(name + "gRPC", [nBytes](State& state) {
        bench::GrpcEcho echo(Folder() + "/grpc");
        const std::string body(nBytes, 'x');
        MeasureCalls(state, nBytes, [&] { return echo.Ask(body); });
    });
}

std::atomic<int64_t> nDeliveredG{0};

void WaitForDelivered(int64_t n) {
    while (nDeliveredG < n) std::this_thread::yield();
}

/// One iteration is one change, which every stream gets.
void RegisterStreams(const char* library, int64_t nStreams) {
    Register(std::string("response in a stream/1,000 streams/") + library, [nStreams](State& state) {
        Road road;
        const ref<sornschema::RecordingSearch> search = NewSearch(road.Pool(), 100);
        nDeliveredG = 0;
        for (int64_t i = 0; i < nStreams; ++i) {
            unsigned rpcId = 0;
            road.Client().SendRequestAsync(
                search.get(), true, [](unsigned, bool, const char*) { ++nDeliveredG; }, rpcId);
        }
        // All requests are there once a request behind them is answered.
        ref<sorn::LazyDict> response;
        if (!road.Client().SendRequestSync(search.get(), response)) state.SkipWithError("no service");
        int64_t nWanted = 0;
        for (auto _ : state) {
            nWanted += nStreams;
            road.Service().Change();
            WaitForDelivered(nWanted);
        }
        state.SetItemsProcessed(state.iterations() * nStreams);
        state.SetBytesProcessed(state.iterations() * nStreams);  // a byte a response, so that rates compare
    });
}

}  // namespace

int main(int argc, char** argv) {
    RegisterRoundTrip("1 KiB", 1024, true);
    RegisterRoundTrip("5 MiB", 5 * 1024 * 1024 - 1024, false);
    RegisterStreams("one stream", 1);
    RegisterStreams("sorn", 1000);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return std::system(("rm -rf " + Folder()).c_str());
}
