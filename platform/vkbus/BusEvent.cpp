#include "vkbus/BusEvent.h"

#include <utility>

#include "rox/RoxAssert.h"

namespace {

thread_local BusEvent* innermostG = nullptr;

}  // namespace

BusEvent::~BusEvent() {
    RoxAssert(pMessageM == nullptr, "bus: an event ends with its message");
}

void BusEvent::Fill(uint32_t id, const void* record, sd_bus_message* message) {
    idM = id;
    pRecordM = record;
    pMessageM = message;
}

void BusEvent::Empty() {
    pMessageM = sd_bus_message_unref(pMessageM);
}

void BusEvent::BeginDelivery() {
    pOuterM = std::exchange(innermostG, this);
}

void BusEvent::EndDelivery() {
    innermostG = pOuterM;
    keptM = nullptr;
}

BusEvent* BusEvent::Find(uintptr_t word2, uintptr_t word1) {
    BusEvent* event = innermostG;
    while (event != nullptr && (event->Word1() != word1 || event->Word2() != word2)) {
        event = event->pOuterM;
    }
    return event;
}

const ref<BusKeptEvent>& BusEvent::Keep() {
    if (!keptM) {
        keptM = new BusKeptEvent(endpointM, std::move(arenaM), std::exchange(pMessageM, nullptr));
    }
    return keptM;
}
