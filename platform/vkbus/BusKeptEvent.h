#pragma once

#include <systemd/sd-bus.h>

#include "rox/RoxCore.h"
#include "rox/ref.h"
#include "vkbus/BusArena.h"

class BusEndpoint;

/// What a record that is kept beyond its callback needs: its memory, and the message whose texts and rows it
/// uses. Any thread may be the last one to hold it, but not with the endpoint's lock.
class BusKeptEvent : public RoxCore {
 public:
    /// Takes the reference on the message over.
    BusKeptEvent(BusEndpoint& endpoint, BusArena arena, sd_bus_message* message);
    ~BusKeptEvent() override;

 private:
    ref<BusEndpoint> endpointM;
    BusArena arenaM;
    sd_bus_message* pMessageM;
};
