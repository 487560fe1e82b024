#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "ScriptedBus.h"
#include "TestClock.h"
#include "VkLocalorvoClientProbe.h"
#include "client/VkLocalorvoClient.h"
#include "rox/RoxMempool.h"
#include "rox/RoxSpinLockHold.h"
#include "sornschema/Error.h"
#include "support/Watchdog.h"

using Lines = std::vector<std::string>;

/// What a callback got, on whichever thread.
struct Received {
    unsigned rpcId;
    bool isFinal;
    std::string json;
    void* context;

    bool operator==(const Received&) const = default;
};

/// A client on the scripted bus, with all modules started.
class ClientTest : public testing::Test {
 protected:
    ClientTest() {
        bus.Reset();
        TestClock::Reset();
        receivedG.clear();
        onReceivedG = nullptr;
        EXPECT_EQ(0u, RoxInitInfo::StartAll(&pool));
    }
    ~ClientTest() override {
        bus.onSend = nullptr;
        RoxInitInfo::StopAll();  // which waits for activities that still end
        EXPECT_EQ(0u, bus.NOpen());
    }

    /// The client, connected; the record is empty then.
    ref<VkLocalorvoClient> Connected() {
        ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        EXPECT_EQ((Lines{"open", "session", "hello"}), bus.Calls());
        bus.ForgetCalls();
        return client;
    }
    /// Connected and monitored, without anything pending.
    ref<VkLocalorvoClient> Monitored() {
        ref<VkLocalorvoClient> client = Connected();
        VkLocalorvoClientProbe{*client}.StartMonitoring();
        bus.ForgetCalls();
        return client;
    }
    /// An asynchronous request; its number.
    unsigned SendAsync(const ref<VkLocalorvoClient>& client, bool isMultiple, void* context = nullptr) {
        unsigned rpcId = 0;
        EXPECT_TRUE(
            context == nullptr
                ? client->SendRequestAsync(object.get(), isMultiple, &OnResponse, rpcId)
                : client->SendRequestAsync(object.get(), isMultiple, &OnContextResponse, context, rpcId));
        return rpcId;
    }
    static std::string Tables(const ref<VkLocalorvoClient>& client) {
        return VkLocalorvoClientProbe{*client}.Tables();
    }
    static bool FMonitored(const ref<VkLocalorvoClient>& client) {
        return VkLocalorvoClientProbe{*client}.FMonitored();
    }

    static void OnResponse(unsigned rpcId, bool isFinal, const char* json) {
        Keep({rpcId, isFinal, json, nullptr});
    }
    static void OnContextResponse(unsigned rpcId, bool isFinal, const char* json, void* context) {
        Keep({rpcId, isFinal, json, context});
    }
    /// What the callbacks got since the start.
    static std::vector<Received> AllReceived() {
        std::lock_guard<std::mutex> hold(mutexG);
        return receivedG;
    }
    /// Called out of each callback of this fixture.
    static void OnReceived(std::function<void(const Received&)> call) { onReceivedG = std::move(call); }

    const Watchdog watchdog;
    ScriptedBus& bus = ScriptedBus::Get();
    RoxMempool pool{"client test"};
    ref<sorn::SornObject> object = sornschema::Error::Factory(&pool);

 private:
    static void Keep(const Received& received) {
        {
            std::lock_guard<std::mutex> hold(mutexG);
            receivedG.push_back(received);
        }
        const std::function<void(const Received&)> call = onReceivedG;  // which may set another
        if (call) call(received);
    }

    static inline std::mutex mutexG;
    static inline std::vector<Received> receivedG;
    static inline std::function<void(const Received&)> onReceivedG;
};
