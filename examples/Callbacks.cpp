// Sends two requests at once and takes their responses by callback, on a thread of the client's.
#include <cstdio>
#include <cstring>

#include "client/VkLocalorvoClient.h"
#include "rox/RoxCoreSemaphore.h"
#include "rox/RoxMempool.h"
#include "sornschema/ChannelSearch.h"
#include "sornschema/RecordingSearch.h"

namespace {

constexpr long long patienceG = 5000;  // milliseconds

/// What a request's callback leaves for the thread that waits.
struct Answer {
    const char* name;
    ref<RoxCoreSemaphore> arrived;
    size_t nBytes = 0;
};

/// The text is valid only during the call. A callback may send, update and cancel; it must not wait for a
/// response.
void OnResponse(unsigned, bool, const char* json, void* context) {
    auto* const answer = static_cast<Answer*>(context);
    answer->nBytes = std::strlen(json);
    answer->arrived->Release();
}

template <class Search>
bool Ask(RoxMempool* pool, Answer& answer) {
    const ref<Search> search(new (pool) Search);
    unsigned rpcId = 0;
    return VkLocalorvoClient::Get()->SendRequestAsync(search.get(), /* multipleResponses */ false,
                                                      &OnResponse, &answer, rpcId);
}

int AskBoth(RoxMempool* pool) {
    Answer channels{"channels", ref<RoxCoreSemaphore>(new (pool) RoxCoreSemaphore(0))};
    Answer recordings{"recordings", ref<RoxCoreSemaphore>(new (pool) RoxCoreSemaphore(0))};
    bool isAllThere = Ask<sornschema::ChannelSearch>(pool, channels);
    isAllThere = Ask<sornschema::RecordingSearch>(pool, recordings) && isAllThere;
    for (Answer* answer : {&channels, &recordings}) {
        if (!isAllThere || !answer->arrived->AcquireFor(patienceG)) {
            isAllThere = false;
            continue;
        }
        std::printf("%s: %s\n", answer->name, answer->nBytes > 2 ? "a list" : "nothing");
    }
    // No callback runs after this, so that what they refer to may end.
    VkLocalorvoClient::Destroy();
    if (!isAllThere) std::fputs("no response; does \"sorn serve\" run?\n", stderr);
    return isAllThere ? 0 : 1;
}

}  // namespace

int main() {
    RoxMempool pool("example");
    RoxInitInfo::StartAll(&pool);
    const int code = AskBoth(&pool);
    RoxInitInfo::StopAll();
    return code;
}
