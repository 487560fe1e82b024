#pragma once

#include <cstdint>

/// What the handling of one event delivers on this thread, for a waiter that handles events itself.
class DeliveryOfThread {
 public:
    /// Lives around the handling of an event by a waiter.
    DeliveryOfThread();
    ~DeliveryOfThread();
    DeliveryOfThread(const DeliveryOfThread&) = delete;
    DeliveryOfThread& operator=(const DeliveryOfThread&) = delete;

    /// Whether it was the response to another request than this one.
    bool FToOther(uint32_t rpcId) const { return rpcIdM != 0 && rpcIdM != rpcId; }

    /// A response went to the waiter or the callback of the request with this number.
    static void Note(uint32_t rpcId);

    /// Whether this thread runs a callback.
    static bool FInside();

    /// Lives around a callback.
    class Inside {
     public:
        Inside();
        ~Inside();
        Inside(const Inside&) = delete;
        Inside& operator=(const Inside&) = delete;
    };

 private:
    uint32_t rpcIdM = 0;
};
