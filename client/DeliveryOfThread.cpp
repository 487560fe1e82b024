#include "client/DeliveryOfThread.h"

namespace {
thread_local DeliveryOfThread* currentG = nullptr;
thread_local bool isInsideG = false;
}  // namespace

DeliveryOfThread::DeliveryOfThread() {
    currentG = this;
}

DeliveryOfThread::~DeliveryOfThread() {
    currentG = nullptr;
}

void DeliveryOfThread::Note(uint32_t rpcId) {
    if (currentG != nullptr) currentG->rpcIdM = rpcId;
}

bool DeliveryOfThread::FInside() {
    return isInsideG;
}

DeliveryOfThread::Inside::Inside() {
    isInsideG = true;
}

DeliveryOfThread::Inside::~Inside() {
    isInsideG = false;
}
