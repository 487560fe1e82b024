#include "client/MonitoringActivity.h"

#include "vkbus/VkBus.h"

namespace {
thread_local MonitoringActivity* currentG = nullptr;
}  // namespace

MonitoringActivity::Listener::Listener(MonitoringActivity* activity)
    : RoxListenerInterface<RoxFdEvent>([](RoxListenerInterface<RoxFdEvent>* listener) {
          static_cast<Listener*>(listener)->pActivity->ProcessBusEvent();
      }),
      pActivity(activity) {}

MonitoringActivity::MonitoringActivity(const ref<VkLocalorvoClient>& client,
                                       const ref<RoxCoreSemaphore>& stop,
                                       const ref<RoxCoreSemaphore>& stopped,
                                       const ref<RoxCoreSemaphore>& started)
    : RoxActivity("WDKMonitoringActivity", &VkLocalorvoClient::initInfo, stop, stopped, nullptr, started),
      clientM(client),
      fdM(new (GetMempool()) RoxFd),
      listenerM(this) {
    SetPriority(RoxThread::PRIORITY_NORMAL);
}

MonitoringActivity::~MonitoringActivity() = default;

void MonitoringActivity::EndWatchOfThread() {
    if (currentG != nullptr) currentG->EndWatch();
}

void MonitoringActivity::EndWatch() {
    fdM->ClearListener();
    fdM->ClearFd();
}

void MonitoringActivity::ActivityStart() {
    currentG = this;
    fdM->SetListener(&listenerM);
    // The connection may be lost by now: then there is nothing to watch.
    connectionM = clientM->GetHandles().connection;
    const int fd = VkBusGetSelectFd(connectionM);
    if (fd < 0 || !fdM->SetFd(fd, RoxFd::eventReadableG)) Done();
}

void MonitoringActivity::ProcessBusEvent() {
    if (VkBusProcessOneEvent(connectionM, nullptr) != 0) Done();
}

void MonitoringActivity::ActivityStop() {
    EndWatch();
    currentG = nullptr;
    clientM = nullptr;
}
