#include "vkbus/BusPoller.h"

#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <sys/timerfd.h>

#include "rox/RoxAssert.h"
#include "rox/RoxMonotonicTime.h"

bool BusPoller::Open() {
    processM = getpid();
    epollM = BusFd(epoll_create1(EPOLL_CLOEXEC));
    wakeM = BusFd(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK));
    return epollM.FOpen() && wakeM.FOpen() && Watch(wakeM.Get(), EPOLLIN, wokenG);
}

bool BusPoller::Watch(int fd, uint32_t events, uint64_t tag) {
    epoll_event event = {};
    event.events = events;
    event.data.u64 = tag;
    return FOurs() && epoll_ctl(epollM.Get(), EPOLL_CTL_ADD, fd, &event) == 0;
}

void BusPoller::Rewatch(int fd, uint32_t events, uint64_t tag) {
    epoll_event event = {};
    event.events = events;
    event.data.u64 = tag;
    RoxAssert(!FOurs() || epoll_ctl(epollM.Get(), EPOLL_CTL_MOD, fd, &event) == 0,
              "bus: a watched socket is not watched");
}

void BusPoller::Unwatch(int fd) {
    if (FOurs()) {
        epoll_ctl(epollM.Get(), EPOLL_CTL_DEL, fd, nullptr);
    }
}

void BusPoller::Wake() {
    if (!fWokenM && FOurs()) {
        fWokenM = true;
        eventfd_write(wakeM.Get(), 1);
    }
}

void BusPoller::ClearWake() {
    if (fWokenM && FOurs()) {
        fWokenM = false;
        eventfd_t count;
        eventfd_read(wakeM.Get(), &count);
    }
}

bool BusPoller::SetTimer(int64_t nanoseconds) {
    if (!FOurs()) {
        return false;
    }
    if (!timerM.FOpen()) {
        timerM = BusFd(timerfd_create(CLOCK_MONOTONIC, TFD_CLOEXEC | TFD_NONBLOCK));
        if (!timerM.FOpen() || !Watch(timerM.Get(), EPOLLIN, timerG)) {
            return false;
        }
    }
    itimerspec when = {};
    when.it_value.tv_sec = static_cast<time_t>(nanoseconds / 1'000'000'000);
    when.it_value.tv_nsec = static_cast<long>(nanoseconds % 1'000'000'000);
    return timerfd_settime(timerM.Get(), 0, &when, nullptr) == 0;
}

uint64_t BusPoller::Look(int milliseconds) {
    epoll_event event;
    // A signal counts as nothing: the caller looks at its time and comes again.
    return epoll_wait(epollM.Get(), &event, 1, milliseconds) == 1 ? event.data.u64 : nothingG;
}

uint64_t BusPoller::Wait(const BusDeadline& deadline) {
    if (deadline.FPassed()) {
        return Look(0);
    }
    const int64_t start = RoxMonotonicTime::Now();
    const auto elapsed = [start] { return RoxMonotonicTime::ToNanoseconds(RoxMonotonicTime::Now() - start); };
    const bool looks = patienceM.FLook();
    uint64_t tag = nothingG;
    while (looks && tag == nothingG && elapsed() < BusPatience::lookG) {
        tag = Look(0);
    }
    if (tag == nothingG) {
        tag = Look(deadline.Milliseconds());
    }
    patienceM.Note(looks, tag != nothingG ? elapsed() : INT64_MAX);
    return tag;
}
