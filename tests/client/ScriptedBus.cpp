#include "ScriptedBus.h"

#include <gtest/gtest.h>
#include <sys/eventfd.h>

#include <algorithm>

#include "TestClock.h"

namespace {

// The words of a serial event: the second is a number of this thread's event, the first a mark.
constexpr uintptr_t markG = 0x5EE5;
thread_local uintptr_t nEventG = 0;
thread_local const void* arrivalG = nullptr;

std::string HeaderOf(const std::string& text, const std::string& name) {
    const size_t at = text.find("\r\n" + name + ": ");
    if (at == std::string::npos) return "";
    const size_t begin = at + name.size() + 4;
    return text.substr(begin, text.find("\r\n", begin) - begin);
}

}  // namespace

ScriptedBus& ScriptedBus::Get() {
    static auto* const bus = new ScriptedBus;
    return *bus;
}

ScriptedBus::ScriptedBus() : readyFdM(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK | EFD_SEMAPHORE)) {}

void ScriptedBus::Reset() {
    std::lock_guard<std::mutex> hold(mutexM);
    nRefuseOpen = nRefuseSession = nRefuseHello = nFailSend = nFailDecode = 0;
    openingTime = sendingTime = 0;
    onSend = nullptr;
    onHello = nullptr;
    arrivalsM.clear();
    for (eventfd_t one; eventfd_read(readyFdM, &one) == 0;) {
    }
    callsM.clear();
    sentM.clear();
    eventResultsM.clear();
    openM.clear();
}

bool ScriptedBus::TakeOne(unsigned& count) {
    if (count == 0) return false;
    --count;
    return true;
}

std::string ScriptedBus::ResponseText(uint32_t rpcId, const std::string& isFinal, const std::string& body,
                                      const std::string& moreHeaders) {
    const std::string headers = "Content-Type: application/json\r\nIsFinal: " + isFinal +
                                "\r\nRpcId: " + std::to_string(rpcId) + "\r\n" + moreHeaders +
                                "Type: response\r\n\r\n";
    return "ORPC/2 " + std::to_string(headers.size()) + " " + std::to_string(body.size()) + "\r\n" + headers +
           body;
}

void ScriptedBus::Arrive(Arrival arrival) {
    std::lock_guard<std::mutex> hold(mutexM);
    arrivalsM.push_back(std::move(arrival));
    eventfd_write(readyFdM, 1);
}

void ScriptedBus::Respond(uint32_t rpcId, bool isFinal, const std::string& body) {
    RespondWithText(ResponseText(rpcId, isFinal ? "true" : "false", body));
}

void ScriptedBus::RespondWithText(const std::string& text) {
    Arrive({Arrival::event, VkAesResponse::idG, text});
}

void ScriptedBus::SendEvent(uint32_t eventId) {
    Arrive({Arrival::event, eventId, ""});
}

void ScriptedBus::CloseFromAfar(unsigned result) {
    Arrive({Arrival::closing, 0, "", result});
}

void ScriptedBus::FailProcessing() {
    Arrive({Arrival::failure, 0, "", VK_BUS_SYSTEM});
}

void ScriptedBus::DoMeanwhile(std::function<void()> work) {
    Arrive({Arrival::meanwhile, 0, "", VK_BUS_DONE, std::move(work)});
}

void ScriptedBus::WaitHandled() {
    std::unique_lock<std::mutex> lock(mutexM);
    handledM.wait(lock, [this] { return arrivalsM.empty() && nInHandM == 0; });
}

std::vector<std::string> ScriptedBus::Calls() {
    std::lock_guard<std::mutex> hold(mutexM);
    return callsM;
}

std::vector<std::string> ScriptedBus::CallsBeside() {
    std::vector<std::string> calls = Calls();
    std::erase_if(calls, [](const std::string& call) { return call == "fd" || call.starts_with("process"); });
    return calls;
}

void ScriptedBus::ForgetCalls() {
    std::lock_guard<std::mutex> hold(mutexM);
    callsM.clear();
    sentM.clear();
}

size_t ScriptedBus::Count(const std::string& call) {
    const std::vector<std::string> calls = Calls();
    return static_cast<size_t>(std::count(calls.begin(), calls.end(), call));
}

std::vector<std::string> ScriptedBus::Sent() {
    std::lock_guard<std::mutex> hold(mutexM);
    return sentM;
}

std::vector<unsigned> ScriptedBus::EventResults() {
    std::lock_guard<std::mutex> hold(mutexM);
    return eventResultsM;
}

unsigned ScriptedBus::NOpen() {
    std::lock_guard<std::mutex> hold(mutexM);
    return static_cast<unsigned>(openM.size());
}

unsigned ScriptedBus::Open(const VkBusTypeLibrary& library, const char* name, uint32_t* connection) {
    std::lock_guard<std::mutex> hold(mutexM);
    EXPECT_EQ(&busTypeLibrary, &library);
    EXPECT_STREQ("VkLocalorvoClient", name);
    if (TakeOne(nRefuseOpen)) {
        Note("open refused");
        return VK_BUS_NO_SERVICE;
    }
    Note("open");
    openM.push_back(*connection = ++lastHandleM);
    return VK_BUS_DONE;
}

unsigned ScriptedBus::OpenSession(uint32_t connection, unsigned protocolId, unsigned checksum,
                                  VkBusEventCallback event, VkBusCloseCallback close, void* context,
                                  unsigned reserved, uint32_t* session) {
    TestClock::Advance(openingTime);
    std::lock_guard<std::mutex> hold(mutexM);
    EXPECT_EQ(1, std::count(openM.begin(), openM.end(), connection));
    EXPECT_EQ(171754u, protocolId);
    EXPECT_EQ(8678623u, checksum);
    EXPECT_EQ(0u, reserved);
    if (TakeOne(nRefuseSession)) {
        Note("session refused");
        return VK_BUS_REFUSED;
    }
    Note("session");
    eventM = event;
    closeM = close;
    contextM = context;
    openM.push_back(*session = ++lastHandleM);
    return VK_BUS_DONE;
}

unsigned ScriptedBus::Send(uint32_t session, unsigned eventId, const void* record) {
    TestClock::Advance(sendingTime);
    std::string text;
    bool isFailure = false;
    std::function<void(const std::string&)> call;
    if (eventId == VkAesHello::idG && onHello) onHello();
    {
        std::lock_guard<std::mutex> hold(mutexM);
        EXPECT_EQ(1, std::count(openM.begin(), openM.end(), session));
        if (eventId == 172967) {
            EXPECT_EQ(0u, static_cast<const VkAesHello*>(record)->partnerId);
            const bool isRefused = TakeOne(nRefuseHello);
            Note(isRefused ? "hello refused" : "hello");
            return isRefused ? VK_BUS_LOST : VK_BUS_DONE;
        }
        EXPECT_EQ(171750u, eventId);
        const auto& packet = static_cast<const VkAesRequest*>(record)->orpcV2Packet;
        text.assign(reinterpret_cast<const char*>(packet.vElement), packet.count);
        const std::string count = HeaderOf(text, "ResponseCount");
        Note(HeaderOf(text, "Type") + " " + HeaderOf(text, "RpcId") + (count.empty() ? "" : " " + count));
        sentM.push_back(text);
        isFailure = TakeOne(nFailSend);
        call = onSend;
    }
    if (call) call(text);
    return isFailure ? VK_BUS_LOST : VK_BUS_DONE;
}

int ScriptedBus::SelectFd(uint32_t connection) {
    std::lock_guard<std::mutex> hold(mutexM);
    Note("fd");
    return std::count(openM.begin(), openM.end(), connection) == 1 ? readyFdM : -1;
}

unsigned ScriptedBus::Process(uint32_t connection, const int64_t* limit) {
    Arrival arrival;
    {
        std::lock_guard<std::mutex> hold(mutexM);
        Note(limit != nullptr ? "process " + std::to_string(*limit) : "process");
        if (std::count(openM.begin(), openM.end(), connection) == 0) return VK_BUS_NO_HANDLE;
        if (arrivalsM.empty()) {
            if (limit == nullptr) return VK_BUS_DONE;
            TestClock::Advance(*limit);
            return VK_BUS_TIMED_OUT;
        }
        arrival = std::move(arrivalsM.front());
        arrivalsM.pop_front();
        eventfd_t one;
        eventfd_read(readyFdM, &one);
        ++nInHandM;
    }
    const unsigned result = Handle(arrival);
    std::lock_guard<std::mutex> hold(mutexM);
    --nInHandM;
    handledM.notify_all();
    return result;
}

unsigned ScriptedBus::Handle(const Arrival& arrival) {
    if (arrival.kind == Arrival::closing) closeM(0xABCD, 0xDCBA, contextM);
    if (arrival.kind == Arrival::meanwhile) arrival.work();
    if (arrival.kind != Arrival::event) return arrival.result;
    arrivalG = &arrival;
    const unsigned result = eventM(0xABCD, markG, ++nEventG, contextM);
    arrivalG = nullptr;
    std::lock_guard<std::mutex> hold(mutexM);
    eventResultsM.push_back(result);
    return VK_BUS_DONE;
}

unsigned ScriptedBus::CloseSession(uint32_t session) {
    std::lock_guard<std::mutex> hold(mutexM);
    Note("close session");
    EXPECT_EQ(1u, std::erase(openM, session));
    return VK_BUS_DONE;
}

unsigned ScriptedBus::CloseConnection(uint32_t connection) {
    std::lock_guard<std::mutex> hold(mutexM);
    Note("close");
    EXPECT_EQ(1u, std::erase(openM, connection));
    return VK_BUS_DONE;
}

unsigned ScriptedBus::EventId(uintptr_t word2, uintptr_t word1) {
    EXPECT_EQ(nEventG, word2);
    EXPECT_EQ(markG, word1);
    return static_cast<const Arrival*>(arrivalG)->id;
}

unsigned ScriptedBus::Decode(const VkBusTypeLibrary& library, uintptr_t word2, uintptr_t word1,
                             const void** record) {
    EXPECT_EQ(&busTypeLibrary, &library);
    EXPECT_EQ(VkAesResponse::idG, EventId(word2, word1));
    {
        std::lock_guard<std::mutex> hold(mutexM);
        if (TakeOne(nFailDecode)) return VK_BUS_BAD_EVENT;
    }
    const std::string& text = static_cast<const Arrival*>(arrivalG)->text;
    thread_local VkAesResponse decoded;
    decoded.orpcV2Packet = {static_cast<uint32_t>(text.size()),
                            reinterpret_cast<const uint8_t*>(text.data())};
    *record = &decoded;
    return VK_BUS_DONE;
}
