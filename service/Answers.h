#pragma once

#include <cstdint>
#include <functional>
#include <string_view>

#include "rox/RoxMempool.h"
#include "service/Failure.h"
#include "sorn/rpc/OrvoRpcWrapper.h"

namespace sorn::service {

/// The way of responses to the sessions.
class Answers {
 public:
    /// Sends the bytes of one message to a session. One that cannot be sent is dropped: its session is over
    /// or will be.
    using Send = std::function<void(uint32_t session, std::string_view message)>;

    Answers(RoxMempool& pool, Send send) : poolM(pool), sendM(std::move(send)) {}

    /// A body of JSON text.
    void SendText(uint32_t session, uint32_t rpcId, bool isFinal, std::string_view text);
    /// A record of type "success" as the final response.
    void SendSuccess(uint32_t session, uint32_t rpcId);
    /// A record of type "error" as the final response. Its words are UTF-8, whatever bytes they quote.
    void SendError(uint32_t session, uint32_t rpcId, const Failure& failure);

 private:
    void SendMessage(uint32_t session, const ref<OrvoRpcWrapper>& message);

    RoxMempool& poolM;
    Send sendM;
};

}  // namespace sorn::service
