#pragma once

#include <unistd.h>

#include <cstdint>

#include "vkbus/BusDeadline.h"
#include "vkbus/BusFd.h"
#include "vkbus/BusPatience.h"

/// The one descriptor that a connection or a listener hands out: an epoll descriptor over its sockets, a
/// timer and an event counter for what the sockets do not show. What is registered changes while other
/// threads wait; the kernel tells them. Any thread; the counter and the timer are set with the owner's lock
/// held.
class BusPoller {
 public:
    /// What Wait gives: one of these, or the tag of a socket, from firstTagG on.
    enum : uint64_t { nothingG = 0, wokenG = 1, timerG = 2, connectG = 3, firstTagG = 16 };

    /// False when the process has no descriptors left.
    bool Open();
    /// Whether this is the process that has opened it. A child shares the descriptors with its parent, whose
    /// watches and whose sockets are none of its business: there all but Wait does nothing.
    bool FOurs() const { return processM == getpid(); }
    /// Readable when something is there to be served.
    int SelectFd() const { return epollM.Get(); }

    /// Watches a socket for EPOLLIN, EPOLLOUT or both; its errors are always told.
    bool Watch(int fd, uint32_t events, uint64_t tag);
    void Rewatch(int fd, uint32_t events, uint64_t tag);
    /// Before the socket is closed: another process may hold a copy, which would keep it watched.
    void Unwatch(int fd);

    /// Makes Wait give wokenG until ClearWake.
    void Wake();
    void ClearWake();
    /// Makes Wait give timerG from so many nanoseconds on, until it is set anew; 0 for never. False without
    /// descriptors.
    bool SetTimer(int64_t nanoseconds);

    /// What is ready, one at a time and each in turn; waits for it, in whole milliseconds.
    uint64_t Wait(const BusDeadline& deadline);

 private:
    uint64_t Look(int milliseconds);

    BusFd epollM;
    BusFd wakeM;
    BusFd timerM;
    pid_t processM = 0;
    bool fWokenM = false;
    BusPatience patienceM;
};
