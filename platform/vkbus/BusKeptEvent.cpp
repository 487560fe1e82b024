#include "vkbus/BusKeptEvent.h"

#include <utility>

#include "vkbus/BusEndpoint.h"

BusKeptEvent::BusKeptEvent(BusEndpoint& endpoint, BusArena arena, sd_bus_message* message)
    : endpointM(&endpoint), arenaM(std::move(arena)), pMessageM(message) {}

BusKeptEvent::~BusKeptEvent() {
    endpointM->Drop(pMessageM);
}
