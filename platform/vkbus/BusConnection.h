#pragma once

#include "vkbus/BusEndpoint.h"

/// A client's end: one socket, and one session over it.
class BusConnection : public BusEndpoint {
 public:
    /// Connects to the service and makes the handle known.
    static unsigned Open(const VkBusTypeLibrary& library, const char* name, uint32_t* handle);

    /// Asks for the session and waits for the answer, while any thread may process the connection.
    unsigned OpenSession(BusSessionTerms terms, uint32_t* handle);

    BusConnection(const VkBusTypeLibrary& library, const char* name) : shapeM(library), nameM(name) {}
    ~BusConnection() override;

    BusConnection* AsConnection() override { return this; }
    const BusShape& Shape() const { return shapeM; }

 private:
    void OnSessionOver(uint32_t) override { BeOver(); }
    void OnClose() override { socketM.Close(); }
    void WaitForQueue(BusSession& session) override;

    const BusShape shapeM;
    const std::string nameM;
    BusFd socketM;  // until the session takes it up
};
