#include "vkbus/BusSession.h"

#include <cstring>
#include <utility>

#include "rox/RoxAssert.h"
#include "vkbus/BusEndpoint.h"
#include "vkbus/BusMarshaller.h"
#include "vkbus/BusUnmarshaller.h"

namespace {

constexpr char pathG[] = "/";
constexpr char interfaceG[] = "sorn.Bus";
constexpr char openG[] = "Open";
constexpr char openSignatureG[] = "uus";
constexpr char eventG[] = "Event";
constexpr char eventSignatureG[] = "uu";  // followed by that of the members
constexpr char refusedG[] = "sorn.Bus.Refused";
constexpr uint32_t requestBytesG = 256;  // about
constexpr size_t maxNameLengthG = 255;

}  // namespace

BusSession::BusSession(BusEndpoint& endpoint, BusPoller& poller, uint32_t handle,
                       const BusSessionTerms& terms)
    : endpointM(&endpoint), handleM(handle), termsM(terms), linkM(poller, handle) {}

BusSession::~BusSession() {
    RoxAssert(phaseM == Phase::over, "bus: a session dies closed");
}

bool BusSession::Start(BusFd socket, const std::string& name) {
    if (linkM.Start(std::move(socket), termsM.fService) && (termsM.fService || Ask(name))) {
        return true;
    }
    End(VK_BUS_LOST);
    return false;
}

bool BusSession::Ask(const std::string& name) {
    sd_bus_message* message = nullptr;
    const bool asked =
        sd_bus_message_new_method_call(linkM.Bus(), &message, nullptr, pathG, interfaceG, openG) >= 0 &&
        sd_bus_message_append(message, openSignatureG, termsM.pProtocol->id, termsM.checksum, name.c_str()) >=
            0 &&
        linkM.Send(message, requestBytesG, &requestCookieM);
    sd_bus_message_unref(message);
    return asked;
}

void BusSession::End(unsigned reason) {
    if (phaseM == Phase::over) {
        return;
    }
    fNoticeDueM = phaseM == Phase::open;
    phaseM = Phase::over;
    reasonM = reason;
    pRequestM = sd_bus_message_unref(pRequestM);
    linkM.Close();
}

BusSession::Arrival BusSession::Take(BusEvent& event) {
    if (phaseM == Phase::over) {
        return Arrival::over;
    }
    bool alive = false;
    sd_bus_message* message = linkM.Receive(alive);
    if (message == nullptr) {
        if (alive) {
            return Arrival::nothing;
        }
        End(VK_BUS_LOST);
        return Arrival::over;
    }
    if (phaseM == Phase::open) {
        return TakeEvent(message, event);
    }
    const Arrival arrival = termsM.fService ? TakeRequest(message) : TakeAnswer(message);
    sd_bus_message_unref(message);
    return arrival;
}

BusSession::Arrival BusSession::TakeRequest(sd_bus_message* message) {
    uint32_t id = 0;
    uint32_t checksum = 0;
    const char* name = "";
    if (phaseM != Phase::opening || sd_bus_message_is_method_call(message, interfaceG, openG) <= 0 ||
        sd_bus_message_has_signature(message, openSignatureG) <= 0 ||
        sd_bus_message_read(message, openSignatureG, &id, &checksum, &name) <= 0 ||
        strlen(name) > maxNameLengthG) {
        End(VK_BUS_NOT_ALLOWED);
        return Arrival::over;
    }
    pRequestM = sd_bus_message_ref(message);
    if (id != termsM.pProtocol->id || checksum != termsM.checksum) {
        Refuse();
        return Arrival::over;
    }
    clientNameM = name;
    phaseM = Phase::asked;
    return Arrival::request;
}

void BusSession::Answer(bool accepted) {
    if (phaseM != Phase::asked) {
        return;
    }
    if (!accepted) {
        Refuse();
        return;
    }
    sd_bus_message* answer = nullptr;
    const bool answered = sd_bus_message_new_method_return(pRequestM, &answer) >= 0 &&
                          linkM.Send(answer, requestBytesG, nullptr);
    sd_bus_message_unref(answer);
    pRequestM = sd_bus_message_unref(pRequestM);
    if (!answered) {
        End(VK_BUS_LOST);
        return;
    }
    phaseM = Phase::open;
}

void BusSession::Refuse() {
    sd_bus_reply_method_errorf(pRequestM, refusedG, "no such session here");
    End(VK_BUS_REFUSED);
}

BusSession::Arrival BusSession::TakeAnswer(sd_bus_message* message) {
    uint64_t cookie = 0;
    const bool answer = sd_bus_message_get_reply_cookie(message, &cookie) >= 0 && cookie == requestCookieM;
    if (answer && sd_bus_message_is_method_error(message, nullptr) <= 0) {
        phaseM = Phase::open;
        return Arrival::opened;
    }
    End(answer ? VK_BUS_REFUSED : VK_BUS_NOT_ALLOWED);
    return Arrival::over;
}

BusSession::Arrival BusSession::TakeEvent(sd_bus_message* message, BusEvent& event) {
    const unsigned result = ReadEvent(message, event);
    if (result == VK_BUS_DONE) {
        return Arrival::event;
    }
    sd_bus_message_unref(message);
    End(result);
    return Arrival::over;
}

// On success the event has taken the message.
unsigned BusSession::ReadEvent(sd_bus_message* message, BusEvent& event) {
    uint32_t id = 0;
    uint32_t checksum = 0;
    BusUnmarshaller reader(termsM.shape, message, event.Arena());
    if (sd_bus_message_is_signal(message, interfaceG, eventG) <= 0 || !reader.ReadUnsigned(id) ||
        !reader.ReadUnsigned(checksum)) {
        return VK_BUS_BAD_EVENT;
    }
    const BusTransitionDescriptor* transition = FindTransition(false, id);
    if (transition == nullptr) {
        return VK_BUS_NOT_ALLOWED;
    }
    const BusStructDescriptor* descriptor = termsM.shape.FindStruct(id);
    if (descriptor == nullptr) {
        return VK_BUS_BAD_TYPE;
    }
    if (checksum != descriptor->checksum || !FBodyFits(message, *descriptor)) {
        return VK_BUS_BAD_EVENT;
    }
    const void* record = reader.ReadRecord(*descriptor);
    if (record == nullptr) {
        return reader.Size().FExceeded() ? VK_BUS_TOO_LARGE : VK_BUS_BAD_EVENT;
    }
    stateM = transition->nextState;
    event.Fill(id, record, message);
    return VK_BUS_DONE;
}

bool BusSession::FBodyFits(sd_bus_message* message, const BusStructDescriptor& descriptor) const {
    BusSignature signature;
    const char* found = sd_bus_message_get_signature(message, 1);
    const size_t nFront = strlen(eventSignatureG);
    return termsM.shape.SignMembers(descriptor, 0, signature) && found != nullptr &&
           strncmp(found, eventSignatureG, nFront) == 0 && strcmp(found + nFront, signature.text) == 0;
}

unsigned BusSession::Send(uint32_t eventId, const void* record) {
    if (phaseM != Phase::open) {
        return phaseM == Phase::over ? reasonM : VK_BUS_NOT_ALLOWED;
    }
    const BusTransitionDescriptor* transition = FindTransition(true, eventId);
    if (transition == nullptr) {
        return VK_BUS_NOT_ALLOWED;
    }
    const BusStructDescriptor* descriptor = termsM.shape.FindStruct(eventId);
    sd_bus_message* message = nullptr;
    uint32_t nBytes = 0;
    if (descriptor == nullptr) {
        return VK_BUS_BAD_TYPE;
    }
    if (sd_bus_message_new_signal(linkM.Bus(), &message, pathG, interfaceG, eventG) < 0) {
        return VK_BUS_LOST;
    }
    unsigned result = WriteEvent(message, *descriptor, record, nBytes);
    if (result == VK_BUS_DONE && !linkM.FRoomFor(nBytes)) {
        result = VK_BUS_QUEUE_FULL;
    } else if (result == VK_BUS_DONE && !linkM.Send(message, nBytes, nullptr)) {
        result = VK_BUS_LOST;
    }
    sd_bus_message_unref(message);
    if (result == VK_BUS_DONE) {
        stateM = transition->nextState;
    } else if (result == VK_BUS_QUEUE_FULL && termsM.fService) {
        End(result);
    }
    return result;
}

unsigned BusSession::WriteEvent(sd_bus_message* message, const BusStructDescriptor& descriptor,
                                const void* record, uint32_t& nBytes) {
    BusSignature signature;
    BusMarshaller writer(termsM.shape, message);
    if (!termsM.shape.SignMembers(descriptor, 0, signature)) {
        return VK_BUS_BAD_TYPE;
    }
    const bool written = writer.AddUnsigned(descriptor.id) && writer.AddUnsigned(descriptor.checksum) &&
                         writer.AddMembers(descriptor, record);
    nBytes = writer.Size().Get();
    if (written) {
        return VK_BUS_DONE;
    }
    return writer.Size().FExceeded() ? VK_BUS_TOO_LARGE : VK_BUS_BAD_EVENT;
}

const BusTransitionDescriptor* BusSession::FindTransition(bool fOutgoing, uint32_t eventId) const {
    const BusProtocolDescriptor& protocol = *termsM.pProtocol;
    if (stateM >= protocol.nStates) {
        return nullptr;
    }
    const uint32_t direction =
        fOutgoing == termsM.fService ? VkBusEventDirection::SEND : VkBusEventDirection::RECEIVE;
    const BusProtocolStateDescriptor& state = protocol.vState[stateM];
    for (uint32_t i = 0; i < state.nTransitions; ++i) {
        if (state.vTransition[i].eventId == eventId && state.vTransition[i].direction == direction) {
            return &state.vTransition[i];
        }
    }
    return nullptr;
}
