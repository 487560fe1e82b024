#pragma once

#include <atomic>
#include <cstddef>
#include <string>
#include <thread>

/// Stands between a client and a service, one connection at a time, and can cut off what the service sends.
class Proxy {
 public:
    /// Listens on `address`, and passes connections on to `service`.
    Proxy(const std::string& address, const std::string& service);
    ~Proxy();

    /// The next connection gets so many bytes from the service, and then its end; or, with `isStall`, nothing
    /// more.
    void CutNext(size_t nBytes, bool isStall = false);

    /// Bytes from the service so far.
    std::atomic<size_t> nPassed{0};

 private:
    void Run();
    void Pass(int client, int service, size_t nLeft, bool isStall);
    /// False when the proxy ends.
    bool Wait(int first, int second, bool& isFirst, bool& isSecond) const;

    std::string serviceM;
    int listenerM;
    int endM;
    std::atomic<size_t> nNextM{SIZE_MAX};
    std::atomic<bool> isStallM{false};
    std::thread threadM;
};
