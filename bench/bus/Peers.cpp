#include "bus/Peers.h"

#include <grpcpp/grpcpp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

#include "echo.grpc.pb.h"

namespace bench {

namespace {

class EchoImpl final : public Echo::Service {
    grpc::Status Ask(grpc::ServerContext*, const Body* request, Body* response) override {
        *response = *request;
        return grpc::Status::OK;
    }
};

/// Moves all bytes in one direction; false at the end of the stream.
template <class Move>
bool MoveAll(size_t n, Move move) {
    for (size_t done = 0; done < n;) {
        const ssize_t moved = move(done, n - done);
        if (moved <= 0) return false;
        done += static_cast<size_t>(moved);
    }
    return true;
}

bool WriteAll(int fd, const std::string& bytes) {
    return MoveAll(bytes.size(), [&](size_t at, size_t n) { return write(fd, bytes.data() + at, n); });
}

bool ReadAll(int fd, std::string& bytes) {
    return MoveAll(bytes.size(), [&](size_t at, size_t n) { return read(fd, bytes.data() + at, n); });
}

}  // namespace

struct GrpcEcho::State {
    EchoImpl service;
    std::unique_ptr<grpc::Server> server;
    std::unique_ptr<Echo::Stub> stub;
};

GrpcEcho::GrpcEcho(const std::string& path) : stateM(std::make_unique<State>()) {
    const std::string address = "unix:" + path;
    grpc::ServerBuilder builder;
    builder.AddListeningPort(address, grpc::InsecureServerCredentials());
    builder.SetMaxReceiveMessageSize(-1);
    builder.RegisterService(&stateM->service);
    stateM->server = builder.BuildAndStart();
    grpc::ChannelArguments arguments;
    arguments.SetMaxReceiveMessageSize(-1);
    stateM->stub =
        Echo::NewStub(grpc::CreateCustomChannel(address, grpc::InsecureChannelCredentials(), arguments));
}

GrpcEcho::~GrpcEcho() {
    stateM->server->Shutdown();
}

bool GrpcEcho::Ask(const std::string& body) {
    grpc::ClientContext context;
    Body request;
    Body response;
    request.set_bytes(body);
    return stateM->stub->Ask(&context, request, &response).ok() && response.bytes().size() == body.size();
}

SocketEcho::SocketEcho(size_t nBytes) : bytesM(nBytes, 'x') {
    int vEnds[2];
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, vEnds) != 0) {
        std::perror("socketpair");
        std::exit(1);
    }
    ownM = vEnds[0];
    otherM = vEnds[1];
    threadM = std::thread([this] {
        std::string bytes(bytesM.size(), 0);
        while (ReadAll(otherM, bytes) && WriteAll(otherM, bytes)) {
        }
    });
}

SocketEcho::~SocketEcho() {
    shutdown(ownM, SHUT_RDWR);
    threadM.join();
    close(ownM);
    close(otherM);
}

bool SocketEcho::Ask() {
    return WriteAll(ownM, bytesM) && ReadAll(ownM, bytesM);
}

}  // namespace bench
