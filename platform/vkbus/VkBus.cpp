#include "vkbus/VkBus.h"

#include "vkbus/BusAddress.h"
#include "vkbus/BusConnection.h"
#include "vkbus/BusListener.h"

const char* VkBusResultText(unsigned result) {
    switch (result) {
        case VK_BUS_DONE:
            return "done";
        case VK_BUS_NO_HANDLE:
            return "no such handle";
        case VK_BUS_TIMED_OUT:
            return "timed out";
        case VK_BUS_LOST:
            return "connection lost";
        case VK_BUS_NO_SERVICE:
            return "nobody listens on the address";
        case VK_BUS_ADDRESS_IN_USE:
            return "address in use";
        case VK_BUS_BAD_ADDRESS:
            return "address cannot be used";
        case VK_BUS_WRONG_USER:
            return "the other end belongs to another user";
        case VK_BUS_REFUSED:
            return "session refused";
        case VK_BUS_BAD_TYPE:
            return "unknown or bad type";
        case VK_BUS_NOT_ALLOWED:
            return "not allowed by the protocol";
        case VK_BUS_BAD_EVENT:
            return "bad event";
        case VK_BUS_TOO_LARGE:
            return "event too large";
        case VK_BUS_QUEUE_FULL:
            return "the other end does not read";
        case VK_BUS_SYSTEM:
            return "system call failed";
        default:
            return "unknown result";
    }
}

void VkBusSetAddress(const char* path) {
    BusAddress::Set(path);
}

std::string VkBusGetAddress() {
    return BusAddress().Path();
}

unsigned VkBusOpenNamedConnection(const VkBusTypeLibrary& library, const char* name, uint32_t* connection) {
    return library.format == VkBusTypeLibrary::formatG ? BusConnection::Open(library, name, connection)
                                                       : VK_BUS_BAD_TYPE;
}

unsigned VkBusOpenSession(uint32_t connection, unsigned protocolId, unsigned checksum,
                          VkBusEventCallback eventCallback, VkBusCloseCallback closeCallback, void* context,
                          unsigned, uint32_t* session) {
    const ref<BusEndpoint> found = BusEndpoint::Endpoints().Find(connection);
    BusConnection* client = found ? found->AsConnection() : nullptr;
    if (client == nullptr) {
        return VK_BUS_NO_HANDLE;
    }
    const BusProtocolDescriptor* protocol = client->Shape().FindProtocol(protocolId);
    if (protocol == nullptr) {
        return VK_BUS_BAD_TYPE;
    }
    return client->OpenSession(
        {client->Shape(), protocol, checksum, false, nullptr, eventCallback, closeCallback, context},
        session);
}

unsigned VkBusListen(const VkBusTypeLibrary& library, unsigned protocolId, unsigned checksum,
                     VkBusAcceptCallback acceptCallback, VkBusEventCallback eventCallback,
                     VkBusCloseCallback closeCallback, void* context, uint32_t* listener) {
    const BusShape shape(library);
    const BusProtocolDescriptor* protocol =
        library.format == VkBusTypeLibrary::formatG ? shape.FindProtocol(protocolId) : nullptr;
    if (protocol == nullptr) {
        return VK_BUS_BAD_TYPE;
    }
    return BusListener::Open(
        {shape, protocol, checksum, true, acceptCallback, eventCallback, closeCallback, context}, listener);
}

unsigned VkBusMarshalAndSend(uint32_t session, unsigned eventId, const void* record) {
    const ref<BusSession> found = BusEndpoint::Sessions().Find(session);
    return found ? found->Endpoint().Send(*found, eventId, record) : unsigned{VK_BUS_NO_HANDLE};
}

int VkBusGetSelectFd(uint32_t connection) {
    const ref<BusEndpoint> found = BusEndpoint::Endpoints().Find(connection);
    return found ? found->SelectFd() : -1;
}

unsigned VkBusProcessOneEvent(uint32_t connection, const int64_t* limitNanoseconds) {
    const ref<BusEndpoint> found = BusEndpoint::Endpoints().Find(connection);
    return found ? found->ProcessOneEvent(limitNanoseconds) : unsigned{VK_BUS_NO_HANDLE};
}

unsigned VkBusCloseSession(uint32_t session) {
    const ref<BusSession> found = BusEndpoint::Sessions().Find(session);
    if (!found) {
        return VK_BUS_NO_HANDLE;
    }
    found->Endpoint().CloseSession(*found);
    return VK_BUS_DONE;
}

unsigned VkBusCloseConnection(uint32_t connection) {
    const ref<BusEndpoint> found = BusEndpoint::Endpoints().Take(connection);
    if (!found) {
        return VK_BUS_NO_HANDLE;
    }
    found->Close();
    return VK_BUS_DONE;
}

void VkBusCloseAll() {
    for (const uint32_t handle : BusEndpoint::Endpoints().All()) {
        VkBusCloseConnection(handle);
    }
}

unsigned VkMarshal_GetTypeFromSerialEvent(uintptr_t word2, uintptr_t word1) {
    const BusEvent* event = BusEvent::Find(word2, word1);
    return event != nullptr ? event->Id() : 0;
}

unsigned VkMarshal_UnmarshalSerialEvent(const VkBusTypeLibrary& library, uintptr_t word2, uintptr_t word1,
                                        const void** record) {
    const BusEvent* event = BusEvent::Find(word2, word1);
    if (event == nullptr) {
        return VK_BUS_NO_HANDLE;
    }
    if (&library != &event->Library()) {
        return VK_BUS_BAD_TYPE;
    }
    *record = event->Record();
    return VK_BUS_DONE;
}

ref<RoxCore> VkMarshal_KeepSerialEvent(uintptr_t word2, uintptr_t word1) {
    BusEvent* event = BusEvent::Find(word2, word1);
    return event != nullptr ? event->Keep() : nullptr;
}
