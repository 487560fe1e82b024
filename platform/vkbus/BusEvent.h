#pragma once

#include <systemd/sd-bus.h>

#include <cstdint>

#include "vkbus/BusArena.h"
#include "vkbus/BusKeptEvent.h"
#include "vkbus/BusTypes.h"

/// An event that has come in, with its record; lives on the stack of the thread that delivers it. Filled and
/// emptied with the lock of its message's bus held.
class BusEvent {
 public:
    BusEvent(BusEndpoint& endpoint, const VkBusTypeLibrary& library)
        : endpointM(endpoint), libraryM(library), arenaM(library) {}
    /// The message must be gone by now.
    ~BusEvent();
    BusEvent(const BusEvent&) = delete;
    BusEvent& operator=(const BusEvent&) = delete;

    BusArena& Arena() { return arenaM; }
    /// Takes a message whose texts and rows the record uses.
    void Fill(uint32_t id, const void* record, sd_bus_message* message);
    void Empty();

    /// While it is being delivered on this thread it is found by the words of its callback. Deliveries nest.
    /// Without the lock.
    void BeginDelivery();
    void EndDelivery();
    uintptr_t Word1() const { return reinterpret_cast<uintptr_t>(this); }
    uintptr_t Word2() const { return idM; }
    /// Null for words of no event that is being delivered on this thread.
    static BusEvent* Find(uintptr_t word2, uintptr_t word1);

    uint32_t Id() const { return idM; }
    const void* Record() const { return pRecordM; }
    const VkBusTypeLibrary& Library() const { return libraryM; }
    /// What the record lives as long as, if that is longer than this. While it is being delivered.
    const ref<BusKeptEvent>& Keep();

 private:
    BusEndpoint& endpointM;
    const VkBusTypeLibrary& libraryM;
    BusArena arenaM;
    uint32_t idM = 0;
    const void* pRecordM = nullptr;
    sd_bus_message* pMessageM = nullptr;
    ref<BusKeptEvent> keptM;
    BusEvent* pOuterM = nullptr;
};
