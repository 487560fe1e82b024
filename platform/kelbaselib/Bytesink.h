#pragma once

namespace kelbaselib {

/// Takes bytes. A sink belongs to one thread at a time.
class Bytesink {
 public:
    /// Takes `count` bytes and gives how many were taken: fewer than `count` means that the sink is full or
    /// broken.
    virtual unsigned Write(const void* bytes, unsigned count) = 0;
    /// Called once by whoever has written all there is, if it says so; a sink with nothing to finish does
    /// nothing.
    virtual void Finish() {}

    Bytesink(const Bytesink&) = delete;
    Bytesink& operator=(const Bytesink&) = delete;

 protected:
    Bytesink() = default;
    // Behind Write and Finish, which are the first two in the table of virtual operations.
    virtual ~Bytesink();
};

}  // namespace kelbaselib
