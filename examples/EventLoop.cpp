// Embeds the service into a program's own event loop, through the descriptor of the bus: no thread, nothing
// that waits but the loop itself. This is the bus below the client; messages are made and read by hand.
#include <poll.h>

#include <cstdio>

#include "client/BusTypeLibrary.h"
#include "rox/RoxMempool.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/model/Schema.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "sornschema/ChannelSearch.h"
#include "vkbus/VkBus.h"

namespace {

constexpr int patienceG = 5000;  // milliseconds
constexpr unsigned rpcIdG = 1;

struct Program {
    RoxMempool* pool;
    bool isAnswered = false;
    bool isLost = false;
};

/// Called out of VkBusProcessOneEvent, which the loop calls.
unsigned OnEvent(uint32_t, uintptr_t word1, uintptr_t word2, void* context) {
    auto* const program = static_cast<Program*>(context);
    const void* record = nullptr;
    if (VkMarshal_GetTypeFromSerialEvent(word2, word1) != VkAesResponse::idG ||
        VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record) != 0) {
        return 1;
    }
    const auto& packet = static_cast<const VkAesResponse*>(record)->orpcV2Packet;
    RoxString error;
    const ref<sorn::OrvoRpcWrapper> message = sorn::OrvoRpcV2::UnmarshalFromString(
        program->pool, RoxString::FromUtf8Bytes(program->pool, packet.count, packet.vElement), false, error);
    auto* const response = dynamic_cast<sorn::ResponseWrapper*>(message.get());
    if (response != nullptr && response->GetRpcId() == rpcIdG) {
        response->UnmarshalToSornObject();
        std::printf("the response is a %s\n", response->GetTypeName().Utf8());
        program->isAnswered = true;
    }
    return 0;
}

void OnClosed(uint32_t, uintptr_t reason, void* context) {
    std::fprintf(stderr, "%s\n", VkBusResultText(static_cast<unsigned>(reason)));
    static_cast<Program*>(context)->isLost = true;
}

bool SendSearch(RoxMempool* pool, uint32_t session) {
    const VkAesHello hello = {0};
    if (VkBusMarshalAndSend(session, VkAesHello::idG, &hello) != 0) return false;
    const ref<sorn::OrvoRpcWrapper> request = sorn::RequestWrapper::New(
        pool, rpcIdG, sorn::RequestWrapper::RESPONSE_COUNT_SINGLE, sorn::Schema::defaultSchemaVersionG,
        ref<sorn::SornObject>(new (pool) sornschema::ChannelSearch), nullptr);
    sorn::ByteBuffer text(pool);
    RoxString error;
    if (!sorn::OrvoRpcV2::MarshalToString(request, text, error, pool, false)) return false;
    const VkAesRequest record = {{text.GetLength(), text.GetData()}};
    return VkBusMarshalAndSend(session, VkAesRequest::idG, &record) == 0;
}

/// The program's loop; here it watches nothing else.
bool Loop(uint32_t connection, Program& program) {
    pollfd watched = {VkBusGetSelectFd(connection), POLLIN, 0};
    while (!program.isAnswered && !program.isLost) {
        if (poll(&watched, 1, patienceG) <= 0) return false;
        if (VkBusProcessOneEvent(connection, nullptr) != 0) return false;
    }
    return program.isAnswered;
}

}  // namespace

int main() {
    RoxMempool pool("example");
    Program program{&pool};
    uint32_t connection = 0;
    uint32_t session = 0;
    const bool isDone = VkBusOpenNamedConnection(busTypeLibrary, "example", &connection) == 0 &&
                        VkBusOpenSession(connection, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                                         &OnEvent, &OnClosed, &program, 0, &session) == 0 &&
                        SendSearch(&pool, session) && Loop(connection, program);
    VkBusCloseSession(session);
    VkBusCloseConnection(connection);
    if (!isDone) std::fputs("no response; does \"sorn serve\" run?\n", stderr);
    return isDone ? 0 : 1;
}
