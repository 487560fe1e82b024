#pragma once

#include "client/VkLocalorvoClient.h"
#include "rox/RoxActivity.h"
#include "rox/RoxFd.h"

/// Handles the events of a client's connection on a thread of its own. It lives by the runtime, holds the
/// client until it has ended, and ends when it is stopped or the connection fails.
class MonitoringActivity : public RoxActivity {
 public:
    MonitoringActivity(const ref<VkLocalorvoClient>& client, const ref<RoxCoreSemaphore>& stop,
                       const ref<RoxCoreSemaphore>& stopped, const ref<RoxCoreSemaphore>& started);
    ~MonitoringActivity() override;

    /// If the caller is on the thread of one: it watches its connection, which is about to be closed, no
    /// longer.
    static void EndWatchOfThread();

    void ActivityStart() override;
    void ActivityStop() override;

 private:
    /// Knows whom its function is for.
    struct Listener : RoxListenerInterface<RoxFdEvent> {
        explicit Listener(MonitoringActivity* activity);
        MonitoringActivity* pActivity;
    };

    void ProcessBusEvent();
    void EndWatch();

    ref<VkLocalorvoClient> clientM;
    uint32_t connectionM = 0;  // the one that it is for: the client may have another by now
    ref<RoxFd> fdM;
    Listener listenerM;
};
