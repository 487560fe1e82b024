#pragma once

#include <systemd/sd-bus.h>

#include <cstdint>
#include <deque>

#include "vkbus/BusFd.h"
#include "vkbus/BusPoller.h"

/// One sd-bus connection over a connected socket: moves messages both ways without ever waiting, and keeps
/// the socket's place in a poller true to what it waits for. All calls, and all calls on its messages, with
/// the owner's lock held: sd-bus counts without atomics.
class BusLink {
 public:
    BusLink(BusPoller& poller, uint64_t tag) : pollerM(poller), tagM(tag) {}
    ~BusLink() { Close(); }
    BusLink(const BusLink&) = delete;
    BusLink& operator=(const BusLink&) = delete;

    /// Takes the socket up, as the end that asks for trust or the one that grants it. False: there is no
    /// link.
    bool Start(BusFd socket, bool fService);
    /// Drops what is queued and closes the socket. Messages that others hold stay readable.
    void Close();
    bool FOpen() const { return pBusM != nullptr; }
    sd_bus* Bus() const { return pBusM; }

    /// The next message that has come in, the caller's to unref; null when there is none now. False in
    /// `alive` says that none will come any more.
    sd_bus_message* Receive(bool& alive);

    /// Hands a message of about so many bytes to the other end; what its kernel does not take waits in a
    /// queue. The cookie, if wanted, is what an answer refers to. False: the link is broken.
    bool Send(sd_bus_message* message, uint32_t nBytes, uint64_t* cookie);
    /// Bytes in the queue, with an overhead for each message, so that empty ones count too.
    uint64_t NQueuedBytes() const { return nQueuedBytesM; }
    /// Whether the queue has room for a message of so many bytes.
    bool FRoomFor(uint32_t nBytes) const;
    /// Writes of the queue what the other end takes now. Whether it makes sense to wait until it takes more.
    bool WriteQueue();
    /// To wait for room to write; other threads may close it meanwhile.
    int Fd() const { return fdM; }

    /// Whether there may be something to receive that the socket does not show.
    bool FMoreToReceive() const { return !arrivedM.empty() || fMayHaveMoreM || fBrokenM; }

 private:
    static int OnMessage(sd_bus_message* message, void* link, sd_bus_error*);
    bool Process();
    bool FDue() const;
    void CountQueue();
    void UpdateWatch();

    // More messages than these are not taken in while the queue is written.
    static constexpr size_t maxArrivedG = 16;

    BusPoller& pollerM;
    const uint64_t tagM;
    sd_bus* pBusM = nullptr;
    int fdM = -1;  // the bus owns it
    std::deque<sd_bus_message*> arrivedM;
    std::deque<uint32_t> queuedSizesM;
    uint64_t nQueuedBytesM = 0;
    uint32_t watchedEventsM = 0;
    bool fBrokenM = false;
    bool fMayHaveMoreM = false;
    bool fDrainedM = false;  // bytes that came along with the handshake have been looked at
};
