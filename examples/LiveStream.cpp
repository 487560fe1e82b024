// Follows a list while it changes: a request with many responses, an update of its query, and its cancel.
#include <cstdio>

#include "client/VkLocalorvoClient.h"
#include "rox/RoxCoreSemaphore.h"
#include "rox/RoxMempool.h"
#include "sorn/dict/Dict.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sornschema/LocalApplicationDataList.h"
#include "sornschema/LocalApplicationDataSearch.h"
#include "sornschema/LocalApplicationDataStore.h"

namespace {

constexpr char appNameG[] = "example";
constexpr long long patienceG = 5000;  // milliseconds

/// The lists of the stream, for the thread that waits for them.
struct Stream {
    RoxMempool* pool;
    ref<RoxCoreSemaphore> changed;
};

void OnList(unsigned rpcId, bool isFinal, const char* json, void* context) {
    const auto* const stream = static_cast<Stream*>(context);
    const ref<sorn::LazyDict> body =
        sorn::LazyDict::FromJsonString(stream->pool, json, sorn::Schema::defaultSchemaVersionG);
    const ref<sorn::SornObject> object = body->ToSornObjectOrError();
    if (object->structId == sornschema::LocalApplicationDataList::structIdG) {
        const auto& list = static_cast<const sornschema::LocalApplicationDataList&>(*object);
        std::printf("request %u: %u entries%s\n", rpcId, list.localApplicationData.GetCount(),
                    isFinal ? ", the last list" : "");
    } else {
        std::printf("request %u: %s\n", rpcId, json);
    }
    stream->changed->Release();
}

ref<sorn::SornObject> NewSearch(RoxMempool* pool, const char* key) {
    const ref<sornschema::LocalApplicationDataSearch> search(new (pool)
                                                                 sornschema::LocalApplicationDataSearch);
    search->appName = appNameG;
    if (key != nullptr) search->key.Add(key);
    return search;
}

/// Stores an entry, as another program might.
bool Store(RoxMempool* pool, const char* key) {
    const ref<sornschema::LocalApplicationDataStore> store(new (pool) sornschema::LocalApplicationDataStore);
    store->appName = appNameG;
    store->key = key;
    store->data = sorn::MakeDict(pool);
    store->data->AddString("written", "now");
    const ref<sorn::SornObject> answer = VkLocalorvoClient::Get()->SendRequestSync(store.get());
    return answer != nullptr && answer->GetTypeName() == "success";
}

/// Each step gives one list more.
bool Follow(RoxMempool* pool, Stream& stream) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    unsigned rpcId = 0;
    return client->SendRequestAsync(NewSearch(pool, nullptr).get(), /* multipleResponses */ true, &OnList,
                                    &stream,
                                    rpcId) &&
           stream.changed->AcquireFor(patienceG) &&                             // what is there
           Store(pool, "first") && stream.changed->AcquireFor(patienceG) &&     // one entry more
           client->SendUpdateRequest(rpcId, NewSearch(pool, "other").get()) &&  //
           stream.changed->AcquireFor(patienceG) &&                             // another query
           Store(pool, "second") &&                                             // nothing that it asks for
           client->CancelRequest(rpcId);
}

}  // namespace

int main() {
    RoxMempool pool("example");
    RoxInitInfo::StartAll(&pool);
    bool isDone = false;
    {
        Stream stream{&pool, ref<RoxCoreSemaphore>(new (&pool) RoxCoreSemaphore(0))};
        isDone = Follow(&pool, stream);
        VkLocalorvoClient::Destroy();  // no callback runs after this
    }
    RoxInitInfo::StopAll();
    if (!isDone) std::fputs("no response; does \"sorn serve\" run?\n", stderr);
    return isDone ? 0 : 1;
}
