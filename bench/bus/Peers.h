#pragma once

#include <memory>
#include <string>
#include <thread>

namespace bench {

/// gRPC over a Unix socket: one service with its own threads, one channel, unary calls that wait.
class GrpcEcho {
 public:
    explicit GrpcEcho(const std::string& path);
    ~GrpcEcho();
    GrpcEcho(const GrpcEcho&) = delete;
    GrpcEcho& operator=(const GrpcEcho&) = delete;

    /// The body there and back; false when that fails.
    bool Ask(const std::string& body);

 private:
    struct State;
    std::unique_ptr<State> stateM;
};

/// A pair of connected Unix stream sockets and a thread at the other end that sends back what came.
class SocketEcho {
 public:
    explicit SocketEcho(size_t nBytes);
    ~SocketEcho();
    SocketEcho(const SocketEcho&) = delete;
    SocketEcho& operator=(const SocketEcho&) = delete;

    /// nBytes there and back.
    bool Ask();

 private:
    int ownM = -1;
    int otherM = -1;
    std::string bytesM;
    std::thread threadM;
};

}  // namespace bench
