#pragma once

#include <gtest/gtest.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <cstring>
#include <string>

#include "BusFixture.h"

/// Bytes of D-Bus messages, put together by hand; little-endian, as both targets are.
class Wire {
 public:
    Wire& Align(size_t n) {
        while (bytes.size() % n != 0) bytes += '\0';
        return *this;
    }
    Wire& U8(unsigned value) {
        bytes += static_cast<char>(value);
        return *this;
    }
    Wire& U32(uint32_t value) {
        Align(4);
        for (int i = 0; i < 4; ++i) bytes += static_cast<char>(value >> 8 * i);
        return *this;
    }
    Wire& Text(const std::string& text) {
        U32(static_cast<uint32_t>(text.size()));
        bytes += text + '\0';
        return *this;
    }
    Wire& Signature(const std::string& text) {
        bytes += static_cast<char>(text.size());
        bytes += text + '\0';
        return *this;
    }
    Wire& Octets(const std::string& octets) {
        U32(static_cast<uint32_t>(octets.size()));
        bytes += octets;
        return *this;
    }

    std::string bytes;
};

/// What a raw message differs in.
struct RawMessage {
    unsigned type = 4;  // 1 call, 2 return, 3 error, 4 signal
    std::string interface = "sorn.Bus";
    std::string member = "Event";
    std::string signature = "";
    std::string body = "";
    uint32_t serial = 1;
    uint32_t replySerial = 0;
    std::string path = "/";

    std::string Bytes() const {
        Wire fields;
        const auto begin = [&fields](unsigned code, const char* type_) {
            fields.Align(8).U8(code).Signature(type_);
        };
        if (replySerial == 0) {
            begin(1, "o");
            fields.Text(path);
            begin(2, "s");
            fields.Text(interface);
            begin(3, "s");
            fields.Text(member);
        } else {
            begin(5, "u");
            fields.U32(replySerial);
            if (type == 3) {
                begin(4, "s");
                fields.Text("sorn.Bus.Refused");
            }
        }
        if (!signature.empty()) {
            begin(8, "g");
            fields.Signature(signature);
        }
        Wire message;
        message.U8('l').U8(type).U8(0).U8(1);
        message.U32(static_cast<uint32_t>(body.size())).U32(serial);
        message.Octets(fields.bytes).Align(8);
        return message.bytes + body;
    }
};

inline std::string OpenMessage(uint32_t protocol = 171754, uint32_t checksum = 8678623,
                               const std::string& name = "raw") {
    return RawMessage{.type = 1,
                      .member = "Open",
                      .signature = "uus",
                      .body = Wire().U32(protocol).U32(checksum).Text(name).bytes}
        .Bytes();
}
inline std::string HelloMessage() {
    return RawMessage{.signature = "uuu", .body = Wire().U32(172967).U32(0x229581).U32(0).bytes, .serial = 2}
        .Bytes();
}
inline std::string PacketMessage(uint32_t id, const std::string& packet, uint32_t checksum = 0x6F671A) {
    return RawMessage{
        .signature = "uuay", .body = Wire().U32(id).U32(checksum).Octets(packet).bytes, .serial = 3}
        .Bytes();
}

/// What a client says before its first message: its user by number, in hexadecimal of its digits.
inline std::string ClientGreeting() {
    std::string hex;
    for (const char digit : std::to_string(geteuid())) {
        char two[3];
        snprintf(two, sizeof(two), "%02x", static_cast<unsigned>(digit));
        hex += two;
    }
    return std::string(1, '\0') + "AUTH EXTERNAL " + hex + "\r\nBEGIN\r\n";
}

/// A socket with no bus behind it.
class RawPeer {
 public:
    RawPeer() = default;
    explicit RawPeer(int fd) : fdM(fd) {}
    explicit RawPeer(const std::string& path) : fdM(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        Connect(path);
    }
    RawPeer(RawPeer&& other) noexcept : fdM(std::exchange(other.fdM, -1)) {}
    ~RawPeer() { Close(); }

    static sockaddr_un Name(const std::string& path) {
        sockaddr_un name = {};
        name.sun_family = AF_UNIX;
        snprintf(name.sun_path, sizeof(name.sun_path), "%s", path.c_str());
        return name;
    }
    bool Connect(const std::string& path) {
        const sockaddr_un name = Name(path);
        return connect(fdM, reinterpret_cast<const sockaddr*>(&name), sizeof(name)) == 0;
    }
    void Close() {
        if (fdM >= 0) close(std::exchange(fdM, -1));
    }
    int Fd() const { return fdM; }

    /// False when the other end does not take it.
    bool Send(const std::string& bytes) {
        size_t done = 0;
        while (done < bytes.size()) {
            const ssize_t n = send(fdM, bytes.data() + done, bytes.size() - done, MSG_NOSIGNAL);
            if (n <= 0) return false;
            done += static_cast<size_t>(n);
        }
        return true;
    }
    /// What comes until it ends with or contains `end`, or the other end closes.
    std::string ReadUntil(const std::string& end) {
        std::string got;
        char some[4096];
        while (got.find(end) == std::string::npos) {
            if (!FReadable(fdM, 60'000)) {
                ADD_FAILURE() << "nothing came";
                break;
            }
            const ssize_t n = recv(fdM, some, sizeof(some), 0);
            if (n <= 0) {
                fClosed = true;
                break;
            }
            got.append(some, static_cast<size_t>(n));
        }
        return got;
    }
    /// Reads all that comes until the other end closes.
    std::string ReadToEnd() { return ReadUntil(std::string("\1never\2comes\3", 13)); }

    bool fClosed = false;

 private:
    int fdM = -1;
};
