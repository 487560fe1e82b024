#pragma once

#include <cstdint>
#include <string>

#include "rox/ref.h"
#include "sorn/rpc/OrvoRpcWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

class RoxMempool;

namespace sorn::tools {

/// A session with the service for messages that the client does not make: with headers of their own. One
/// thread.
class BusSession {
 public:
    /// `trace`: every message goes to standard error. Everything is made in the pool.
    BusSession(RoxMempool* pool, bool trace) : poolM(pool), isTracedM(trace) {}
    ~BusSession();
    BusSession(const BusSession&) = delete;
    BusSession& operator=(const BusSession&) = delete;

    /// Connects to the address that VkBusSetAddress has set; false and words.
    bool Open(std::string& words);
    bool FOpen() const { return sessionM != 0; }
    /// Sends a message and waits for the response with its number, 5 seconds at most, whatever else comes
    /// meanwhile; null and words. When it was the bus that failed, the session is over, too.
    ref<ResponseWrapper> Exchange(const ref<OrvoRpcWrapper>& message, std::string& words);

 private:
    static unsigned OnEvent(uint32_t session, uintptr_t word1, uintptr_t word2, void* self);
    static void OnClosed(uint32_t session, uintptr_t reason, void* self);
    unsigned WaitFor(uint32_t rpcId, int64_t deadline);

    RoxMempool* poolM;
    bool isTracedM;
    uint32_t connectionM = 0;
    uint32_t sessionM = 0;
    ref<ResponseWrapper> responseM;
};

}  // namespace sorn::tools
