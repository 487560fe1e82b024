#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <deque>
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "Service.h"
#include "client/VkLocalorvoClient.h"
#include "client/VkLocalorvoClientProbe.h"
#include "rox/RoxMempool.h"
#include "sornschema/Error.h"
#include "support/Watchdog.h"
#include "vkbus/VkBus.h"

/// What the tests do less of where everything takes ten times as long.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool isSlowG = true;
#else
constexpr bool isSlowG = sizeof(void*) == 4;  // under an emulator
#endif

/// Entries of a folder of /proc/self: "fd" or "task".
inline size_t CountInProc(const char* folder) {
    size_t n = 0;
    for ([[maybe_unused]] const auto& each :
         std::filesystem::directory_iterator(std::string("/proc/self/") + folder)) {
        ++n;
    }
    return n;
}

/// Waits until `condition` holds, for a minute at most.
inline bool WaitUntil(const std::function<bool()>& condition) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::minutes(1);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end) return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    return true;
}

/// Runs `work` on so many threads at once and waits for all.
inline void OnThreads(unsigned nThreads, const std::function<void(unsigned number)>& work) {
    std::vector<std::thread> threads;
    for (unsigned i = 0; i < nThreads; ++i) threads.emplace_back(work, i);
    for (std::thread& each : threads) each.join();
}

/// What a callback was called with, counted; a context of requests.
struct Answers {
    explicit Answers(std::string text = "text") : wanted(std::move(text)) {}

    std::atomic<unsigned> n{0};
    std::atomic<unsigned> nFinal{0};
    std::string wanted;                // in each body
    std::atomic<unsigned> nOthers{0};  // bodies without it
    std::function<void(unsigned rpcId, bool isFinal)> then;

    static void OnResponse(unsigned rpcId, bool isFinal, const char* json, void* context) {
        auto* const self = static_cast<Answers*>(context);
        if (std::string(json).find(self->wanted) == std::string::npos) ++self->nOthers;
        if (self->then) self->then(rpcId, isFinal);
        if (isFinal) ++self->nFinal;
        ++self->n;  // last: who waits for it may end the life of this
    }
};

/// Modules started, on a private address; no descriptor and no thread is left at the end.
class ClientBusTest : public testing::Test {
 protected:
    ClientBusTest() {
        char folder[] = "/tmp/client-test.XXXXXX";
        folderM = mkdtemp(folder);
        address = folderM + "/bus";
        VkBusSetAddress(address.c_str());
        // Sanitizers have a thread of their own from the first one on.
        [[maybe_unused]] static const bool isFirst = (std::thread([] {}).join(), true);
        nDescriptorsM = CountInProc("fd");
        nThreadsM = CountInProc("task");
        EXPECT_EQ(0u, RoxInitInfo::StartAll(&pool));
    }
    ~ClientBusTest() override {
        RoxInitInfo::StopAll();
        VkBusSetAddress(nullptr);
        EXPECT_TRUE(WaitUntil([this] { return CountInProc("fd") <= nDescriptorsM; }));
        EXPECT_TRUE(WaitUntil([this] { return CountInProc("task") <= nThreadsM; }));
        std::filesystem::remove_all(folderM);
    }

    ref<sorn::SornObject> Object(const std::string& text = "text") {
        ref<sorn::SornObject> object = sornschema::Error::Factory(&pool);
        static_cast<sornschema::Error*>(object.get())->text = RoxString(&pool, text.c_str());
        return object;
    }
    /// Whether a synchronous request is answered with its own body.
    bool FAnswered(const ref<VkLocalorvoClient>& client, const std::string& text = "text") {
        ref<sorn::LazyDict> response;
        return client->SendRequestSync(Object(text).get(), response) && response != nullptr &&
               std::string(response->ToJson(false).Utf8()).find(text) != std::string::npos;
    }
    bool SendAsync(const ref<VkLocalorvoClient>& client, bool isMultiple, Answers& answers, unsigned& rpcId) {
        return client->SendRequestAsync(Object(answers.wanted).get(), isMultiple, &Answers::OnResponse,
                                        &answers, rpcId);
    }

    const Watchdog watchdog;
    std::string address;
    RoxMempool pool{"client bus test"};

 private:
    std::string folderM;
    size_t nDescriptorsM = 0;
    size_t nThreadsM = 0;
};
