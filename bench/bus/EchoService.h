#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "rox/RoxMempool.h"
#include "sorn/rpc/OrvoRpcWrapper.h"

namespace bench {

/// The service's end of our bus in a thread of its own. It answers each request that wants one response with
/// the request's body, and keeps requests that want many as streams, which Change sends a response each.
class EchoService {
 public:
    explicit EchoService(const std::string& address);
    ~EchoService();
    EchoService(const EchoService&) = delete;
    EchoService& operator=(const EchoService&) = delete;

    /// Sends a response to every stream that is open. Any thread.
    void Change();

 private:
    static unsigned OnEvent(uint32_t session, uintptr_t word1, uintptr_t word2, void* self);
    static void OnClosed(uint32_t session, uintptr_t reason, void* self);
    void Run();
    void Take(uint32_t session, const ref<sorn::OrvoRpcWrapper>& message);

    struct Stream {
        uint32_t session;
        uint32_t rpcId;
    };

    RoxMempool poolM;
    uint32_t listenerM = 0;
    std::atomic<bool> isStoppedM{false};
    std::mutex mutexM;  // of the streams
    std::vector<Stream> vStreamsM;
    std::thread threadM;
};

}  // namespace bench
