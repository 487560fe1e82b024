#include "vkbus/BusEndpoint.h"

#include <atomic>
#include <new>
#include <optional>
#include <utility>

#include "rox/RoxMutexHold.h"

namespace {

template <class T>
BusHandleTable<T>& NeverDestroyed() {
    alignas(BusHandleTable<T>) static unsigned char memory[sizeof(BusHandleTable<T>)];
    static BusHandleTable<T>* const table = new (memory) BusHandleTable<T>;
    return *table;
}

std::atomic<uint32_t> lastHandleG{BusPoller::firstTagG};

}  // namespace

BusHandleTable<BusEndpoint>& BusEndpoint::Endpoints() {
    return NeverDestroyed<BusEndpoint>();
}

BusHandleTable<BusSession>& BusEndpoint::Sessions() {
    return NeverDestroyed<BusSession>();
}

uint32_t BusEndpoint::NewHandle() {
    uint32_t handle;
    do {
        handle = lastHandleG.fetch_add(1, std::memory_order_relaxed) + 1;
    } while (handle < BusPoller::firstTagG || Endpoints().Find(handle) || Sessions().Find(handle));
    return handle;
}

BusEndpoint::~BusEndpoint() = default;

bool BusEndpoint::Open(uint32_t* handle) {
    if (!pollerM.Open()) {
        return false;
    }
    *handle = NewHandle();
    Endpoints().Add(*handle, this);
    return true;
}

ref<BusSession> BusEndpoint::Add(BusFd socket, const BusSessionTerms& terms, const std::string& clientName) {
    ref<BusSession> session = new BusSession(*this, pollerM, NewHandle(), terms);
    if (!session->Start(std::move(socket), clientName)) {
        return nullptr;
    }
    sessionsM[session->Handle()] = session;
    return session;
}

unsigned BusEndpoint::ProcessOneEvent(const int64_t* limit) {
    const BusDeadline deadline(limit != nullptr ? *limit : 0);
    for (;;) {
        const bool handled = Serve(pollerM.Wait(deadline));
        {
            RoxMutexHold hold(mutexM);
            if (fOverM && attentionM.empty()) {
                return VK_BUS_LOST;
            }
        }
        if (handled || limit == nullptr) {
            return VK_BUS_DONE;
        }
        if (deadline.FPassed()) {
            return VK_BUS_TIMED_OUT;
        }
    }
}

// True when a callback was called, or might have been.
bool BusEndpoint::Serve(uint64_t tag) {
    if (tag == BusPoller::nothingG) {
        return false;
    }
    if (tag == BusPoller::timerG || tag == BusPoller::connectG) {
        RoxMutexHold hold(mutexM);
        if (!fOverM) {
            tag == BusPoller::timerG ? OnTimer() : OnConnect();
        }
        return false;
    }
    return ServeSession(tag);
}

ref<BusSession> BusEndpoint::FindToServe(uint64_t tag) {
    ref<BusSession> session;
    if (tag == BusPoller::wokenG) {
        if (!attentionM.empty()) {
            session = std::move(attentionM.front());
            attentionM.pop_front();
            session->fListed = false;
        }
        if (attentionM.empty() && !fOverM) {
            pollerM.ClearWake();
        }
        return session;
    }
    const auto found = sessionsM.find(static_cast<uint32_t>(tag));
    return found != sessionsM.end() ? found->second : session;
}

bool BusEndpoint::ServeSession(uint64_t tag) {
    ref<BusSession> session;
    std::optional<BusEvent> event;
    BusSession::Arrival arrival;
    bool notice = false;
    {
        RoxMutexHold hold(mutexM);
        session = FindToServe(tag);
        if (!session) {
            return false;
        }
        arrival = session->Take(event.emplace(*this, session->Terms().shape.Library()));
        if (arrival == BusSession::Arrival::over) {
            notice = session->TakeNotice();
        } else if (arrival == BusSession::Arrival::opened || arrival == BusSession::Arrival::request) {
            Sessions().Add(session->Handle(), session.get());
        }
        LookAfter(*session);
    }
    switch (arrival) {
        case BusSession::Arrival::nothing:
            return false;
        case BusSession::Arrival::opened:
            return true;
        case BusSession::Arrival::event:
            Deliver(*session, *event);
            return true;
        case BusSession::Arrival::request:
            Decide(*session);
            return true;
        case BusSession::Arrival::over:
            break;
    }
    const VkBusCloseCallback close = session->Terms().close;
    if (notice && close != nullptr) {
        close(session->Handle(), session->Reason(), session->Terms().context);
    }
    return notice;
}

void BusEndpoint::Decide(BusSession& session) {
    const BusSessionTerms& terms = session.Terms();
    const bool accepted = terms.accept == nullptr ||
                          terms.accept(session.Handle(), session.ClientName().c_str(), terms.context) == 0;
    RoxMutexHold hold(mutexM);
    session.Answer(accepted);
    LookAfter(session);
}

void BusEndpoint::Deliver(BusSession& session, BusEvent& event) {
    const BusSessionTerms& terms = session.Terms();
    event.BeginDelivery();
    const unsigned result = terms.event != nullptr
                                ? terms.event(session.Handle(), event.Word1(), event.Word2(), terms.context)
                                : VK_BUS_DONE;
    event.EndDelivery();
    RoxMutexHold hold(mutexM);
    event.Empty();
    if (result != VK_BUS_DONE) {
        session.End(VK_BUS_BAD_EVENT);
        LookAfter(session);
    }
}

void BusEndpoint::Drop(sd_bus_message* message) {
    RoxMutexHold hold(mutexM);
    sd_bus_message_unref(message);
}

void BusEndpoint::LookAfter(BusSession& session) {
    if (!session.FOver()) {
        if (session.FMoreToReceive()) {
            Attend(session);
        }
        return;
    }
    // The handle goes after the notice, so that whoever closes it in between can count on not being called.
    if (session.FNoticeDue()) {
        Attend(session);
    } else {
        Sessions().Take(session.Handle());
        if (std::exchange(session.fListed, false)) {
            std::erase(attentionM, &session);
        }
    }
    if (sessionsM.erase(session.Handle()) > 0) {
        OnSessionOver(session.Handle());
    }
}

void BusEndpoint::Attend(BusSession& session) {
    if (!session.fListed) {
        session.fListed = true;
        attentionM.push_back(&session);
        pollerM.Wake();
    }
}

unsigned BusEndpoint::Send(BusSession& session, uint32_t eventId, const void* record) {
    unsigned result;
    bool fQueued;
    {
        RoxMutexHold hold(mutexM);
        result = session.Send(eventId, record);
        LookAfter(session);
        fQueued = session.FQueued();
    }
    if (result == VK_BUS_DONE && fQueued) {
        WaitForQueue(session);
    }
    return result;
}

void BusEndpoint::CloseSession(BusSession& session) {
    RoxMutexHold hold(mutexM);
    session.End(VK_BUS_DONE);
    session.ForgetNotice();
    LookAfter(session);
}

void BusEndpoint::Close() {
    RoxMutexHold hold(mutexM);
    for (const auto& [handle, session] : std::exchange(sessionsM, {})) {
        session->End(VK_BUS_DONE);
        session->ForgetNotice();
        Sessions().Take(handle);
    }
    for (const ref<BusSession>& session : std::exchange(attentionM, {})) {
        session->ForgetNotice();
        Sessions().Take(session->Handle());
    }
    OnClose();
    BeOver();
}

void BusEndpoint::BeOver() {
    fOverM = true;
    pollerM.Wake();
}
