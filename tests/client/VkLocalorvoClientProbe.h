#pragma once

#include <initializer_list>
#include <string>

#include "client/VkLocalorvoClient.h"
#include "rox/RoxSpinLockHold.h"

/// What tests see of a client's inside.
struct VkLocalorvoClientProbe {
    VkLocalorvoClient& client;

    /// Numbers of entries: requests, responses, callbacks, contexts; as "1 0 1 1".
    std::string Tables() const {
        RoxSpinLockHold hold(client.tablesLockM);
        std::string text;
        for (const _RoxHashTable* table :
             std::initializer_list<const _RoxHashTable*>{&client.requestTableM, &client.responseTableM,
                                                         &client.callbackTableM, &client.contextTableM}) {
            text += (text.empty() ? "" : " ") + std::to_string(table->Count());
        }
        return text;
    }
    bool FMonitored() const { return client.FMonitored(); }
    uint32_t Connection() const { return client.GetHandles().connection; }
    uint32_t Session() const { return client.GetHandles().session; }
    uint32_t LastRpcId() const {
        RoxSpinLockHold hold(client.tablesLockM);
        return client.lastRpcIdM;
    }
    /// A request under the next number that is pending as if it had been sent.
    void StorePending(const ref<sorn::SornObject>& object, void* context) const {
        client.StoreRequest(
            sorn::RequestWrapper::New(client.GetMempool(), client.NewRpcId(),
                                      sorn::RequestWrapper::RESPONSE_COUNT_MULTIPLE, 42, object, nullptr),
            context, context);
    }
    /// As if it had ended.
    void RemovePending(uint32_t rpcId) const { client.RemoveRequest(rpcId); }
    void StartMonitoring() const { client.StartMonitoring(); }
    void Disconnect() const { client.Disconnect(); }
};
