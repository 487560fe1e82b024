#include "Proxy.h"

#include <gtest/gtest.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>

namespace {

sockaddr_un Name(const std::string& path) {
    sockaddr_un name = {};
    name.sun_family = AF_UNIX;
    snprintf(name.sun_path, sizeof name.sun_path, "%s", path.c_str());
    return name;
}

int NewSocket() {
    return socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
}

// False at the end of either. Bytes are counted before they go on, so that who got them finds them counted.
bool Forward(int from, int to, size_t& nLeft, std::atomic<size_t>& nCounted) {
    char some[4096];
    const ssize_t n = recv(from, some, sizeof some, 0);
    if (n <= 0) return false;
    const size_t nDone = std::min(static_cast<size_t>(n), nLeft);
    nLeft -= nDone;
    nCounted += nDone;
    return nDone == 0 || send(to, some, nDone, MSG_NOSIGNAL) == static_cast<ssize_t>(nDone);
}

}  // namespace

Proxy::Proxy(const std::string& address, const std::string& service)
    : serviceM(service), listenerM(NewSocket()), endM(eventfd(0, EFD_CLOEXEC)) {
    const sockaddr_un name = Name(address);
    EXPECT_EQ(0, bind(listenerM, reinterpret_cast<const sockaddr*>(&name), sizeof name));
    EXPECT_EQ(0, chmod(address.c_str(), 0600));
    EXPECT_EQ(0, listen(listenerM, 16));
    threadM = std::thread(&Proxy::Run, this);
}

Proxy::~Proxy() {
    eventfd_write(endM, 1);
    threadM.join();
    close(listenerM);
    close(endM);
}

void Proxy::CutNext(size_t nBytes, bool isStall) {
    isStallM = isStall;
    nNextM = nBytes;
}

bool Proxy::Wait(int first, int second, bool& isFirst, bool& isSecond) const {
    pollfd watched[] = {{first, POLLIN, 0}, {second, POLLIN, 0}, {endM, POLLIN, 0}};
    if (poll(watched, 3, -1) < 0) return false;
    isFirst = watched[0].revents != 0;
    isSecond = watched[1].revents != 0;
    return watched[2].revents == 0;
}

void Proxy::Run() {
    bool isReady = false;
    bool isOther = false;
    while (Wait(listenerM, -1, isReady, isOther)) {
        const int client = accept4(listenerM, nullptr, nullptr, SOCK_CLOEXEC);
        const int service = NewSocket();
        const sockaddr_un name = Name(serviceM);
        if (connect(service, reinterpret_cast<const sockaddr*>(&name), sizeof name) == 0) {
            Pass(client, service, nNextM.exchange(SIZE_MAX), isStallM);
        }
        close(client);
        close(service);
    }
}

void Proxy::Pass(int client, int service, size_t nLeft, bool isStall) {
    size_t nUnlimited = SIZE_MAX;
    std::atomic<size_t> nSent{0};
    bool fromClient = false;
    bool fromService = false;
    while ((nLeft > 0 || isStall) && Wait(client, service, fromClient, fromService)) {
        if (fromService && !Forward(service, client, nLeft, nPassed)) return;
        if (fromClient && !Forward(client, service, nUnlimited, nSent)) return;
    }
}
