#include "ScriptedBus.h"

// In place of the bus's own: a program's own definitions go before those of shared objects.

unsigned VkBusOpenNamedConnection(const VkBusTypeLibrary& library, const char* name, uint32_t* connection) {
    return ScriptedBus::Get().Open(library, name, connection);
}

unsigned VkBusOpenSession(uint32_t connection, unsigned protocolId, unsigned checksum,
                          VkBusEventCallback eventCallback, VkBusCloseCallback closeCallback, void* context,
                          unsigned reserved, uint32_t* session) {
    return ScriptedBus::Get().OpenSession(connection, protocolId, checksum, eventCallback, closeCallback,
                                          context, reserved, session);
}

unsigned VkBusMarshalAndSend(uint32_t session, unsigned eventId, const void* record) {
    return ScriptedBus::Get().Send(session, eventId, record);
}

int VkBusGetSelectFd(uint32_t connection) {
    return ScriptedBus::Get().SelectFd(connection);
}

unsigned VkBusProcessOneEvent(uint32_t connection, const int64_t* limitNanoseconds) {
    return ScriptedBus::Get().Process(connection, limitNanoseconds);
}

unsigned VkBusCloseSession(uint32_t session) {
    return ScriptedBus::Get().CloseSession(session);
}

unsigned VkBusCloseConnection(uint32_t connection) {
    return ScriptedBus::Get().CloseConnection(connection);
}

unsigned VkMarshal_GetTypeFromSerialEvent(uintptr_t word2, uintptr_t word1) {
    return ScriptedBus::Get().EventId(word2, word1);
}

unsigned VkMarshal_UnmarshalSerialEvent(const VkBusTypeLibrary& library, uintptr_t word2, uintptr_t word1,
                                        const void** record) {
    return ScriptedBus::Get().Decode(library, word2, word1, record);
}

// A bus that cannot do that.
ref<RoxCore> VkMarshal_KeepSerialEvent(uintptr_t, uintptr_t) {
    return nullptr;
}
