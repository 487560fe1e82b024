#include "vkbus/BusLink.h"

#include <poll.h>
#include <sys/epoll.h>
#include <sys/socket.h>

#include <utility>

#include "vkbus/VkBus.h"

bool BusLink::Start(BusFd socket, bool fService) {
    sd_id128_t id = {};
    if (sd_bus_new(&pBusM) < 0) {
        return false;
    }
    fdM = socket.Get();
    // Descriptors in messages are not wanted: sd-bus closes a connection that brings some. The filter sees
    // each message before sd-bus would answer it on its own.
    bool started = sd_bus_set_fd(pBusM, fdM, fdM) >= 0;
    if (started) {
        socket.Release();  // the bus closes it, also when it does not start
        started =
            sd_bus_negotiate_fds(pBusM, 0) >= 0 && sd_bus_add_filter(pBusM, nullptr, &OnMessage, this) >= 0;
    }
    if (started && fService) {
        started = sd_id128_randomize(&id) >= 0 && sd_bus_set_server(pBusM, 1, id) >= 0;
    }
    if (!started || sd_bus_start(pBusM) < 0 || !pollerM.Watch(fdM, watchedEventsM, tagM)) {
        sd_bus_close_unref(std::exchange(pBusM, nullptr));
        return false;
    }
    UpdateWatch();
    return true;
}

void BusLink::Close() {
    if (pBusM == nullptr) {
        return;
    }
    pollerM.Unwatch(fdM);
    if (pollerM.FOurs()) {
        shutdown(fdM, SHUT_RDWR);  // a child process may hold a copy of it
    }
    for (sd_bus_message* message : std::exchange(arrivedM, {})) {
        sd_bus_message_unref(message);
    }
    sd_bus_close_unref(std::exchange(pBusM, nullptr));
    queuedSizesM.clear();
    nQueuedBytesM = 0;
}

int BusLink::OnMessage(sd_bus_message* message, void* link, sd_bus_error*) {
    static_cast<BusLink*>(link)->arrivedM.push_back(sd_bus_message_ref(message));
    return 1;
}

// One step of the bus; false when there was nothing to do. A step may make progress and bring no message. A
// bus that has lost its peer takes no further step: that would close the socket while it is watched.
bool BusLink::Process() {
    const int result = fBrokenM ? -1 : sd_bus_process(pBusM, nullptr);
    fBrokenM |= result < 0 || sd_bus_is_open(pBusM) <= 0;
    fDrainedM |= result == 0 && sd_bus_is_ready(pBusM) > 0;
    return result > 0;
}

sd_bus_message* BusLink::Receive(bool& alive) {
    while (pBusM != nullptr && arrivedM.empty() && Process()) {
    }
    sd_bus_message* message = nullptr;
    if (!arrivedM.empty()) {
        message = arrivedM.front();
        arrivedM.pop_front();
    }
    fMayHaveMoreM = message != nullptr && (!fDrainedM || FDue());
    alive = pBusM != nullptr && (message != nullptr || !fBrokenM);
    CountQueue();
    UpdateWatch();
    return message;
}

bool BusLink::FRoomFor(uint32_t nBytes) const {
    return nQueuedBytesM + nBytes + vkBusEventOverheadG <= maxVkBusQueuedBytesG;
}

bool BusLink::Send(sd_bus_message* message, uint32_t nBytes, uint64_t* cookie) {
    if (pBusM == nullptr || fBrokenM) {
        return false;
    }
    if (sd_bus_send(pBusM, message, cookie) < 0) {
        fBrokenM = true;
        return false;
    }
    queuedSizesM.push_back(nBytes + vkBusEventOverheadG);
    nQueuedBytesM += queuedSizesM.back();
    CountQueue();
    UpdateWatch();
    return true;
}

bool BusLink::WriteQueue() {
    while (nQueuedBytesM > 0 && arrivedM.size() < maxArrivedG && Process()) {
        CountQueue();
    }
    CountQueue();
    UpdateWatch();
    return nQueuedBytesM > 0 && arrivedM.size() < maxArrivedG && !fBrokenM;
}

// The bus tells only how many messages wait; they leave in order.
void BusLink::CountQueue() {
    uint64_t nQueued = 0;
    if (pBusM != nullptr && sd_bus_get_n_queued_write(pBusM, &nQueued) >= 0) {
        while (queuedSizesM.size() > nQueued) {
            nQueuedBytesM -= queuedSizesM.front();
            queuedSizesM.pop_front();
        }
    }
}

bool BusLink::FDue() const {
    uint64_t moment = UINT64_MAX;
    return pBusM != nullptr && sd_bus_get_timeout(pBusM, &moment) >= 0 && moment == 0;
}

void BusLink::UpdateWatch() {
    const int events = pBusM != nullptr ? sd_bus_get_events(pBusM) : -1;
    if (events < 0) {
        return;
    }
    const uint32_t wanted =
        ((events & POLLIN) != 0 ? uint32_t{EPOLLIN} : 0) | ((events & POLLOUT) != 0 ? uint32_t{EPOLLOUT} : 0);
    if (wanted != watchedEventsM) {
        watchedEventsM = wanted;
        pollerM.Rewatch(fdM, wanted, tagM);
    }
}
