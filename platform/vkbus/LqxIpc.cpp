#include "vkbus/LqxIpc.h"

#include "vkbus/VkBus.h"

RoxInitInfo LqxIpc::initInfo("LqxIpc", &LqxIpc::Start, &LqxIpc::Stop, 0, nullptr, 0, nullptr);

// The bus is ready as it is loaded; only the order matters.
unsigned LqxIpc::Start(RoxMempool*) {
    return 0;
}

void LqxIpc::Stop() {
    VkBusCloseAll();
}
