#pragma once

#include <deque>
#include <unordered_map>

#include "rox/RoxMutex.h"
#include "vkbus/BusHandleTable.h"
#include "vkbus/BusSession.h"

class BusConnection;

/// What a handle of a connection or a listener stands for: sessions, the poller over their sockets, and the
/// lock that is held around every call of the transport, never while waiting or calling back. Work that no
/// socket shows (a close to be told, messages that came with others) waits in a list, for which the poller's
/// counter is set.
///
/// Lives by counts: its handle, its sessions and every thread inside an operation hold it. Any thread.
class BusEndpoint : public RoxCore {
 public:
    BusEndpoint() = default;
    ~BusEndpoint() override;

    /// The tables of all handles, which never go away.
    static BusHandleTable<BusEndpoint>& Endpoints();
    static BusHandleTable<BusSession>& Sessions();
    /// A number that is no handle yet.
    static uint32_t NewHandle();

    /// Null for a listener.
    virtual BusConnection* AsConnection() { return nullptr; }

    int SelectFd() const { return pollerM.SelectFd(); }
    unsigned ProcessOneEvent(const int64_t* limit);
    unsigned Send(BusSession& session, uint32_t eventId, const void* record);
    void CloseSession(BusSession& session);
    /// Gives up a reference on a message of one of its sessions.
    void Drop(sd_bus_message* message);
    /// Ends everything; the endpoint only waits for its counts then.
    void Close();

 protected:
    /// Opens the poller and makes the handle known.
    bool Open(uint32_t* handle);
    /// Makes a session of a connected socket. Null when that fails. With the lock.
    ref<BusSession> Add(BusFd socket, const BusSessionTerms& terms, const std::string& clientName);
    /// After anything that a session has done: what is left to be done with it. With the lock.
    void LookAfter(BusSession& session);
    void Attend(BusSession& session);
    /// Nothing can come any more: everyone who waits comes back. With the lock.
    void BeOver();

    // What the two kinds do differently; all but the last are called with the lock held.
    virtual void OnSessionOver(uint32_t) {}
    virtual void OnConnect() {}
    virtual void OnTimer() {}
    virtual void OnClose() {}
    virtual void WaitForQueue(BusSession&) {}

    RoxMutex mutexM{BusLockLevel::endpointG};
    BusPoller pollerM;
    std::unordered_map<uint32_t, ref<BusSession>> sessionsM;
    bool fOverM = false;

 private:
    bool Serve(uint64_t tag);
    bool ServeSession(uint64_t tag);
    ref<BusSession> FindToServe(uint64_t tag);
    void Decide(BusSession& session);
    void Deliver(BusSession& session, BusEvent& event);

    std::deque<ref<BusSession>> attentionM;
};
