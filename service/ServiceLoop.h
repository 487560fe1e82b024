#pragma once

#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "service/BusEnd.h"
#include "service/Service.h"

struct sd_event;
struct sd_event_source;

namespace sorn::service {

/// A service on the bus with the loop that runs it until SIGINT or SIGTERM. Listen blocks these for the
/// thread, so that none is lost on the way to Run; before, they do what they always do. One thread.
class ServiceLoop {
 public:
    /// Is told of each message of each session as it comes and goes; may be null.
    using Observer = std::function<void(std::string_view message)>;

    ServiceLoop(Store& store, const Limits& limits, Observer observer);
    ~ServiceLoop();

    Service& GetService() { return serviceM; }
    /// Listens on a path of the bus, empty for the default; false and words.
    bool Listen(const std::string& address, std::string& words);
    const std::string& GetAddress() const { return busM.GetAddress(); }
    /// Serves until a signal comes or Stop is called; false and words when that cannot be.
    bool Run(std::string& words);
    /// Ends Run; any thread may call it.
    void Stop();

 private:
    struct EndLoop {
        void operator()(sd_event* loop) const;
    };
    struct EndSource {
        void operator()(sd_event_source* source) const;
    };
    using Source = std::unique_ptr<sd_event_source, EndSource>;

    int SetUp();
    int Add();
    void Turn();
    static int OnBus(sd_event_source*, int, uint32_t, void* self);
    static int OnStop(sd_event_source*, int, uint32_t, void* self);
    static int OnTurn(sd_event_source*, void* self);

    Observer observerM;
    BusEnd busM;
    Service serviceM;
    int stopM = -1;  // an eventfd
    std::unique_ptr<sd_event, EndLoop> loopM;
    Source onBusM;
    Source onStopM;
    Source onTurnM;
    Source onInterruptM;
    Source onTerminateM;
};

}  // namespace sorn::service
