#pragma once

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "client/BusTypeLibrary.h"
#include "vkbus/VkBus.h"

/// The bus in this program: a script says what it answers, and every call of it is recorded in order. The
/// record has one line a call:
///
///     open, session, hello         connecting; " refused" behind it when the script wants that
///     request 3 single, requestUpdate 3, cancel 3, response 3   a message that was sent, with its number
///     fd, process LIMIT, process   (without a limit)
///     close session, close
///
/// What is asked for wrongly (an unknown handle, other arguments than the protocol's) fails the test.
class ScriptedBus {
 public:
    static ScriptedBus& Get();
    /// A clean start.
    void Reset();

    // The script. Numbers of times that an operation is going to fail from now on.
    unsigned nRefuseOpen = 0;
    unsigned nRefuseSession = 0;
    unsigned nRefuseHello = 0;
    unsigned nFailSend = 0;
    unsigned nFailDecode = 0;
    /// Nanoseconds of the test's clock that the opening of a session takes, and the sending of a message.
    int64_t openingTime = 0;
    int64_t sendingTime = 0;
    /// Called with every message that is handed to the bus, after it was recorded, without a lock.
    std::function<void(const std::string& text)> onSend;
    /// Called when the hello is handed to the bus, without a lock.
    std::function<void()> onHello;

    // What comes in; each is handled by one call of VkBusProcessOneEvent. Any thread.
    void Respond(uint32_t rpcId, bool isFinal = true, const std::string& body = bodyG);
    void RespondWithText(const std::string& text);
    /// An event of another kind.
    void SendEvent(uint32_t eventId);
    /// The other end closes: the close callback is called, and the operation gives `result`.
    void CloseFromAfar(unsigned result = VK_BUS_LOST);
    /// The operation fails, and no callback is called.
    void FailProcessing();

    /// Nothing comes, but something else happens in the process while the operation waits.
    void DoMeanwhile(std::function<void()> work);

    /// Waits until everything that came in has been handled.
    void WaitHandled();

    /// The record so far; and without the lines of VkBusGetSelectFd and VkBusProcessOneEvent, which an
    /// activity writes when it likes.
    std::vector<std::string> Calls();
    std::vector<std::string> CallsBeside();
    void ForgetCalls();
    size_t Count(const std::string& call);
    /// The texts of the messages sent.
    std::vector<std::string> Sent();
    /// What the event callback gave, in order.
    std::vector<unsigned> EventResults();
    /// Connections and sessions that are open.
    unsigned NOpen();

    static constexpr char bodyG[] = "{\"type\":\"error\",\"code\":\"badArgument\",\"text\":\"no\"}";
    static std::string ResponseText(uint32_t rpcId, const std::string& isFinal, const std::string& body,
                                    const std::string& moreHeaders = "");

    // The bus's own operations come here.
    unsigned Open(const VkBusTypeLibrary& library, const char* name, uint32_t* connection);
    unsigned OpenSession(uint32_t connection, unsigned protocolId, unsigned checksum,
                         VkBusEventCallback event, VkBusCloseCallback close, void* context, unsigned reserved,
                         uint32_t* session);
    unsigned Send(uint32_t session, unsigned eventId, const void* record);
    int SelectFd(uint32_t connection);
    unsigned Process(uint32_t connection, const int64_t* limit);
    unsigned CloseSession(uint32_t session);
    unsigned CloseConnection(uint32_t connection);
    unsigned EventId(uintptr_t word2, uintptr_t word1);
    unsigned Decode(const VkBusTypeLibrary& library, uintptr_t word2, uintptr_t word1, const void** record);

 private:
    struct Arrival {
        enum Kind { event, closing, failure, meanwhile } kind;
        uint32_t id = 0;
        std::string text;
        unsigned result = VK_BUS_DONE;
        std::function<void()> work = nullptr;
    };

    ScriptedBus();
    void Arrive(Arrival arrival);
    unsigned Handle(const Arrival& arrival);
    void Note(const std::string& call) { callsM.push_back(call); }
    static bool TakeOne(unsigned& count);

    std::mutex mutexM;
    std::condition_variable handledM;
    std::deque<Arrival> arrivalsM;
    unsigned nInHandM = 0;
    std::vector<std::string> callsM;
    std::vector<std::string> sentM;
    std::vector<unsigned> eventResultsM;
    std::vector<uint32_t> openM;
    uint32_t lastHandleM = 0;
    int readyFdM;  // counts what has come in
    VkBusEventCallback eventM = nullptr;
    VkBusCloseCallback closeM = nullptr;
    void* contextM = nullptr;
};
