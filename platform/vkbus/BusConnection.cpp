#include "vkbus/BusConnection.h"

#include <poll.h>

#include <algorithm>
#include <utility>

#include "rox/RoxMutexHold.h"
#include "vkbus/BusAddress.h"

namespace {

// Another thread may be the one that meets the answer; then the waiting one looks after so many nanoseconds.
constexpr int64_t lookAgainG = 50'000'000;

}  // namespace

BusConnection::~BusConnection() = default;

unsigned BusConnection::Open(const VkBusTypeLibrary& library, const char* name, uint32_t* handle) {
    ref<BusConnection> connection = new BusConnection(library, name != nullptr ? name : "");
    const unsigned result = BusAddress().Connect(connection->socketM);
    if (result != VK_BUS_DONE) {
        return result;
    }
    return connection->BusEndpoint::Open(handle) ? VK_BUS_DONE : VK_BUS_SYSTEM;
}

unsigned BusConnection::OpenSession(BusSessionTerms terms, uint32_t* handle) {
    ref<BusSession> session;
    {
        RoxMutexHold hold(mutexM);
        if (fOverM) {
            return VK_BUS_LOST;
        }
        if (!socketM.FOpen()) {
            return VK_BUS_NOT_ALLOWED;
        }
        session = Add(std::move(socketM), terms, nameM);
        if (!session) {
            BeOver();
            return VK_BUS_LOST;
        }
    }
    for (;;) {
        const int64_t limit = std::min(session->OpeningDeadline().Remaining(), lookAgainG);
        ProcessOneEvent(&limit);
        RoxMutexHold hold(mutexM);
        if (session->FOpen()) {
            *handle = session->Handle();
            return VK_BUS_DONE;
        }
        if (session->OpeningDeadline().FPassed()) {
            session->End(VK_BUS_TIMED_OUT);
            LookAfter(*session);
        }
        if (session->FOver()) {
            return session->Reason() != VK_BUS_DONE ? session->Reason() : VK_BUS_NO_HANDLE;
        }
    }
}

void BusConnection::WaitForQueue(BusSession& session) {
    const BusDeadline deadline(vkBusSendLimitG);
    while (!deadline.FPassed()) {
        pollfd room = {};
        {
            RoxMutexHold hold(mutexM);
            const bool wait = session.WriteQueue();
            LookAfter(session);
            if (!wait) {
                return;
            }
            room.fd = session.Fd();
        }
        // Should another thread close it meanwhile, this comes back, in time at the latest.
        room.events = POLLOUT;
        poll(&room, 1, deadline.Milliseconds());
    }
}
