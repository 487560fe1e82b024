#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <string>
#include <thread>

/// A request as a service got it.
struct Request {
    uint32_t session;
    std::string kind;  // "request", "requestUpdate", "cancel"
    uint32_t rpcId;
    std::string count;  // of responses
    std::string body;
};

/// A service on the address that is set, with a thread of its own. By default it answers a request with its
/// body: once, or with three responses if many are wanted.
class Service {
 public:
    using OnRequest = std::function<void(const Request&)>;

    explicit Service(OnRequest onRequest = nullptr);
    ~Service() { Stop(); }
    /// Closes all sessions and stops listening.
    void Stop();

    static void Respond(const Request& request, bool isFinal, const std::string& body);
    static void RespondByDefault(const Request& request);
    /// A response of any bytes.
    static void SendText(uint32_t session, const std::string& text);
    static std::string ResponseText(uint32_t rpcId, bool isFinal, const std::string& body);

    std::atomic<unsigned> nHellos{0};
    std::atomic<unsigned> nRequests{0};
    std::atomic<unsigned> nCancels{0};

 private:
    static unsigned OnEvent(uint32_t session, uintptr_t word1, uintptr_t word2, void* service);

    OnRequest onRequestM;
    uint32_t listenerM = 0;
    std::thread threadM;
};
