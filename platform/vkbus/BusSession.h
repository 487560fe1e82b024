#pragma once

#include <string>

#include "rox/RoxCore.h"
#include "rox/ref.h"
#include "vkbus/BusDeadline.h"
#include "vkbus/BusEvent.h"
#include "vkbus/BusLink.h"
#include "vkbus/BusShape.h"
#include "vkbus/VkBus.h"

class BusEndpoint;

/// What a session is for, and whom it calls.
struct BusSessionTerms {
    BusShape shape;
    const BusProtocolDescriptor* pProtocol;
    uint32_t checksum;
    bool fService;
    VkBusAcceptCallback accept;
    VkBusEventCallback event;
    VkBusCloseCallback close;
    void* context;
};

/// One end of a session: the opening, the states of the protocol, events to messages and back. A client asks
/// by a method call that carries protocol id, checksum and its name; an event is a signal that carries the id
/// and the checksum of its structure, and the members.
///
/// All operations but those marked with the endpoint's lock held.
class BusSession : public RoxCore {
 public:
    /// What Take has met.
    enum class Arrival {
        nothing,
        event,    // to be delivered
        request,  // a client asks for the session: to be decided
        opened,   // the service has taken it
        over,     // no further one will come
    };

    BusSession(BusEndpoint& endpoint, BusPoller& poller, uint32_t handle, const BusSessionTerms& terms);
    ~BusSession() override;

    /// Takes a connected socket up; a client asks for the session at once.
    bool Start(BusFd socket, const std::string& name);

    /// The next thing that has come in. An event that breaks the rules ends the session.
    Arrival Take(BusEvent& event);
    /// Answers the request that Take met.
    void Answer(bool accepted);

    unsigned Send(uint32_t eventId, const void* record);
    /// Goes on with what waits to be sent. Whether it makes sense to wait until the other end takes more.
    bool WriteQueue() { return linkM.WriteQueue(); }
    bool FQueued() const { return linkM.NQueuedBytes() > 0; }
    bool FMoreToReceive() const { return linkM.FMoreToReceive(); }
    int Fd() const { return linkM.Fd(); }

    /// Closes the connection for a reason; the first one stands.
    void End(unsigned reason);
    /// Gives up the close callback.
    void ForgetNotice() { fNoticeDueM = false; }
    bool FNoticeDue() const { return fNoticeDueM; }
    /// True once, when the session was open and is over for a reason that is still to be told.
    bool TakeNotice() { return std::exchange(fNoticeDueM, false); }

    bool FOpening() const { return phaseM == Phase::opening || phaseM == Phase::asked; }
    bool FOpen() const { return phaseM == Phase::open; }
    bool FOver() const { return phaseM == Phase::over; }
    unsigned Reason() const { return reasonM; }
    const BusDeadline& OpeningDeadline() const { return openingDeadlineM; }
    /// Whether it waits in its endpoint's list; the endpoint's mark.
    bool fListed = false;

    // Constant: any thread, without the lock.
    BusEndpoint& Endpoint() const { return *endpointM; }
    uint32_t Handle() const { return handleM; }
    const BusSessionTerms& Terms() const { return termsM; }
    /// Constant from the request on.
    const std::string& ClientName() const { return clientNameM; }

 private:
    enum class Phase { opening, asked, open, over };

    bool Ask(const std::string& name);
    Arrival TakeRequest(sd_bus_message* message);
    Arrival TakeAnswer(sd_bus_message* message);
    Arrival TakeEvent(sd_bus_message* message, BusEvent& event);
    unsigned ReadEvent(sd_bus_message* message, BusEvent& event);
    bool FBodyFits(sd_bus_message* message, const BusStructDescriptor& descriptor) const;
    unsigned WriteEvent(sd_bus_message* message, const BusStructDescriptor& descriptor, const void* record,
                        uint32_t& nBytes);
    const BusTransitionDescriptor* FindTransition(bool fOutgoing, uint32_t eventId) const;
    void Refuse();

    const ref<BusEndpoint> endpointM;
    const uint32_t handleM;
    const BusSessionTerms termsM;
    BusLink linkM;
    const BusDeadline openingDeadlineM{vkBusOpeningLimitG};
    Phase phaseM = Phase::opening;
    uint32_t stateM = 0;
    uint64_t requestCookieM = 0;
    sd_bus_message* pRequestM = nullptr;
    std::string clientNameM;
    unsigned reasonM = VK_BUS_DONE;
    bool fNoticeDueM = false;
};
