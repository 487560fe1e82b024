#include "service/ServiceLoop.h"

#include <signal.h>
#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <systemd/sd-event.h>
#include <unistd.h>

#include <cstring>

namespace sorn::service {

namespace {

void BlockSignals() {
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGINT);
    sigaddset(&signals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);
}

}  // namespace

void ServiceLoop::EndLoop::operator()(sd_event* loop) const {
    sd_event_unref(loop);
}
void ServiceLoop::EndSource::operator()(sd_event_source* source) const {
    sd_event_source_disable_unref(source);
}

ServiceLoop::ServiceLoop(Store& store, const Limits& limits, Observer observer)
    : observerM(std::move(observer)),
      busM(
          [this](uint32_t session, std::string_view message) {
              if (observerM) observerM(message);
              serviceM.Receive(session, message);
          },
          [this](uint32_t session) { serviceM.EndSession(session); }),
      serviceM(store, limits,
               [this](uint32_t session, std::string_view message) {
                   if (observerM) observerM(message);
                   busM.Send(session, message);
               }),
      stopM(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {}

ServiceLoop::~ServiceLoop() {
    onBusM.reset();
    onStopM.reset();
    if (stopM >= 0) ::close(stopM);
}

bool ServiceLoop::Listen(const std::string& address, std::string& words) {
    BlockSignals();  // before there is a socket to be left behind
    return busM.Listen(address, words);
}

void ServiceLoop::Stop() {
    const uint64_t one = 1;
    [[maybe_unused]] const ssize_t written = ::write(stopM, &one, sizeof one);
}

bool ServiceLoop::Run(std::string& words) {
    int result = SetUp();
    if (result >= 0) result = sd_event_loop(loopM.get());
    if (result < 0) words = std::string("the event loop: ") + std::strerror(-result);
    return result >= 0;
}

/// Negative, as sd-event gives it, when that fails.
int ServiceLoop::SetUp() {
    sd_event* loop = nullptr;
    const int result = sd_event_new(&loop);
    loopM.reset(loop);
    return result < 0 ? result : Add();
}

int ServiceLoop::Add() {
    const auto keep = [](Source& place, sd_event_source* source) { place.reset(source); };
    sd_event_source* source = nullptr;
    int result = sd_event_add_io(loopM.get(), &source, busM.GetSelectFd(), EPOLLIN, &OnBus, this);
    if (result < 0) return result;
    keep(onBusM, source);
    result = sd_event_add_io(loopM.get(), &source, stopM, EPOLLIN, &OnStop, this);
    if (result < 0) return result;
    keep(onStopM, source);
    result = sd_event_add_defer(loopM.get(), &source, &OnTurn, this);
    if (result < 0) return result;
    keep(onTurnM, source);
    result = sd_event_source_set_enabled(source, SD_EVENT_OFF);
    if (result < 0) return result;
    // Without handlers they end the loop.
    result = sd_event_add_signal(loopM.get(), &source, SIGINT, nullptr, nullptr);
    if (result < 0) return result;
    keep(onInterruptM, source);
    result = sd_event_add_signal(loopM.get(), &source, SIGTERM, nullptr, nullptr);
    if (result >= 0) keep(onTerminateM, source);
    return result;
}

/// New lists go out at once as far as a turn goes; what is left waits for its turn beside the bus.
void ServiceLoop::Turn() {
    const bool isMore = serviceM.Deliver();
    sd_event_source_set_enabled(onTurnM.get(), isMore ? SD_EVENT_ON : SD_EVENT_OFF);
}

int ServiceLoop::OnBus(sd_event_source*, int, uint32_t, void* self) {
    auto& loop = *static_cast<ServiceLoop*>(self);
    loop.busM.ProcessOne();
    loop.Turn();
    return 0;
}

int ServiceLoop::OnStop(sd_event_source*, int, uint32_t, void* self) {
    return sd_event_exit(static_cast<ServiceLoop*>(self)->loopM.get(), 0);
}

int ServiceLoop::OnTurn(sd_event_source*, void* self) {
    static_cast<ServiceLoop*>(self)->Turn();
    return 0;
}

}  // namespace sorn::service
