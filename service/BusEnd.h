#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace sorn::service {

/// The service's end of the bus: sessions of the clients' protocol, and the messages in them. One thread.
class BusEnd {
 public:
    using OnMessage = std::function<void(uint32_t session, std::string_view message)>;
    using OnEnd = std::function<void(uint32_t session)>;

    /// They are called out of ProcessOne; the bytes hold during the call.
    BusEnd(OnMessage onMessage, OnEnd onEnd) : onMessageM(std::move(onMessage)), onEndM(std::move(onEnd)) {}
    ~BusEnd();
    BusEnd(const BusEnd&) = delete;
    BusEnd& operator=(const BusEnd&) = delete;

    /// Listens on a path; empty stands for the bus's default. False and words.
    bool Listen(const std::string& address, std::string& words);
    /// The path that Listen has taken.
    const std::string& GetAddress() const { return addressM; }
    /// Readable, level-triggered, while ProcessOne has something to do.
    int GetSelectFd() const;
    void ProcessOne();
    /// A session that cannot take the message is over, or will be.
    void Send(uint32_t session, std::string_view message);

 private:
    static unsigned Event(uint32_t session, uintptr_t word1, uintptr_t word2, void* self);
    static void Closed(uint32_t session, uintptr_t reason, void* self);

    OnMessage onMessageM;
    OnEnd onEndM;
    std::string addressM;
    uint32_t listenerM = 0;
};

}  // namespace sorn::service
