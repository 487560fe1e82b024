// Sends a request and waits for its response: the titles of the first recordings.
#include <cstdio>

#include "client/VkLocalorvoClient.h"
#include "rox/RoxMempool.h"
#include "sornschema/Recording.h"
#include "sornschema/RecordingList.h"
#include "sornschema/RecordingSearch.h"

namespace {

/// The recordings of the response, a line each; or what the service says is wrong.
int Print(const sorn::SornObject& response) {
    if (response.structId != sornschema::RecordingList::structIdG) {
        std::fprintf(stderr, "%s\n", response.ToString(false, 0).Utf8());
        return 1;
    }
    const auto& list = static_cast<const sornschema::RecordingList&>(response);
    for (unsigned i = 0; i < list.recording.GetCount(); ++i) {
        const auto* recording = static_cast<const sornschema::Recording*>(list.recording.At(i));
        std::printf("%s\n", recording->title.Utf8());
    }
    return 0;
}

int Ask(RoxMempool* pool) {
    const ref<sornschema::RecordingSearch> search(new (pool) sornschema::RecordingSearch);
    search->count = 3;
    search->count_isSet = 1;

    // An error of any kind comes back as an object, too; null says that there was no response.
    const ref<sorn::SornObject> response = VkLocalorvoClient::Get()->SendRequestSync(search.get());
    if (response != nullptr) return Print(*response);
    std::fputs("no response; does \"sorn serve\" run?\n", stderr);
    return 1;
}

}  // namespace

int main() {
    RoxMempool pool("example");  // everything lives here, so it ends last
    RoxInitInfo::StartAll(&pool);
    const int code = Ask(&pool);
    RoxInitInfo::StopAll();
    return code;
}
