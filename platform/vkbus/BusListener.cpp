#include "vkbus/BusListener.h"

#include <poll.h>
#include <sys/epoll.h>
#include <sys/socket.h>

#include <algorithm>
#include <cerrno>
#include <utility>
#include <vector>

#include "rox/RoxMutexHold.h"

namespace {

// Nanoseconds for which nobody is let in when the process has no descriptors left, unless a session ends
// before.
constexpr int64_t pauseG = 100'000'000;

}  // namespace

BusListener::~BusListener() = default;

unsigned BusListener::Open(const BusSessionTerms& terms, uint32_t* handle) {
    ref<BusListener> listener = new BusListener(terms);
    const unsigned result = listener->addressM.Listen(listener->listeningM);
    if (result != VK_BUS_DONE) {
        return result;
    }
    uint32_t made = 0;
    if (!listener->BusEndpoint::Open(&made) || !listener->pollerM.SetTimer(0) ||
        !listener->pollerM.Watch(listener->listeningM.Get(), EPOLLIN, BusPoller::connectG)) {
        Endpoints().Take(made);
        listener->addressM.Remove();
        return VK_BUS_SYSTEM;
    }
    *handle = made;
    return VK_BUS_DONE;
}

void BusListener::OnConnect() {
    BusFd socket(accept4(listeningM.Get(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
    if (!socket.FOpen()) {
        if (errno == EMFILE || errno == ENFILE || errno == ENOMEM || errno == ENOBUFS) {
            Pause();
        }
        return;
    }
    pid_t process = 0;
    if (!BusAddress::FOurUser(socket, &process) || !FRoomFor(process)) {
        return;
    }
    const ref<BusSession> session = Add(std::move(socket), termsM, std::string());
    if (session) {
        processesM[session->Handle()] = process;
        SetTimer();
    }
}

bool BusListener::FRoomFor(pid_t process) const {
    const auto isOf = [process](const auto& each) { return each.second == process; };
    const auto nOfProcess = static_cast<size_t>(std::count_if(processesM.begin(), processesM.end(), isOf));
    return sessionsM.size() < maxVkBusSessionsG &&
           (nOfProcess < maxVkBusSessionsOfProcessG || NInUse(process) < maxVkBusSessionsOfProcessG);
}

// Sessions of a process that it has not left: some that are left still have events to be served.
unsigned BusListener::NInUse(pid_t process) const {
    unsigned n = 0;
    for (const auto& [handle, session] : sessionsM) {
        const auto found = processesM.find(handle);
        if (found != processesM.end() && found->second == process) {
            pollfd socket = {session->Fd(), POLLRDHUP, 0};
            n += poll(&socket, 1, 0) == 0;
        }
    }
    return n;
}

// A socket that nobody is accepted from would be ready all the time.
void BusListener::Pause() {
    if (!fPausedM) {
        fPausedM = true;
        pollerM.Rewatch(listeningM.Get(), 0, BusPoller::connectG);
        SetTimer();
    }
}

void BusListener::Resume() {
    if (std::exchange(fPausedM, false)) {
        pollerM.Rewatch(listeningM.Get(), EPOLLIN, BusPoller::connectG);
    }
}

void BusListener::OnSessionOver(uint32_t session) {
    processesM.erase(session);
    Resume();
}

void BusListener::OnTimer() {
    Resume();
    std::vector<ref<BusSession>> late;
    for (const auto& [handle, session] : sessionsM) {
        if (session->FOpening() && session->OpeningDeadline().FPassed()) {
            late.push_back(session);
        }
    }
    for (const ref<BusSession>& session : late) {
        session->End(VK_BUS_TIMED_OUT);
        LookAfter(*session);
    }
    SetTimer();
}

// For the first of what only time ends.
void BusListener::SetTimer() {
    int64_t next = fPausedM ? pauseG : INT64_MAX;
    for (const auto& [handle, session] : sessionsM) {
        if (session->FOpening()) {
            next = std::min(next, std::max<int64_t>(session->OpeningDeadline().Remaining(), 1));
        }
    }
    pollerM.SetTimer(next != INT64_MAX ? next : 0);
}

void BusListener::OnClose() {
    pollerM.Unwatch(listeningM.Get());
    listeningM.Close();
    if (pollerM.FOurs()) {
        addressM.Remove();
    }
}
