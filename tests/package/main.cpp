// Takes a record through its text, with all that the package offers in sight.
#include <cstdio>

#include "sorn/sorn.h"
#include "sornschema/all.h"

int main() {
    RoxMempool pool("application");
    const ref<sornschema::Recording> recording(new (&pool) sornschema::Recording);
    recording->title = "Tide Tables";
    recording->title_isSet = 1;
    recording->bodyId = "tsn:1";
    const RoxString text = sorn::LazyDict::FromSornObject(&pool, recording, 42)->ToJson(false);
    std::printf("%s\n", text.Utf8());
    // No service runs: the client is there, and has nobody to talk to.
    VkLocalorvoClient::Create(&pool);
    const bool isSent = VkLocalorvoClient::Get()->SendRequestAndForget(recording.get());
    VkLocalorvoClient::Destroy();
    return isSent ? 1 : 0;
}
