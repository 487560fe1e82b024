#pragma once

#include <cstdint>
#include <string>

#include "rox/RoxCore.h"
#include "rox/ref.h"
#include "vkbus/BusTypes.h"

// The bus: sessions between the processes of one user over a Unix-domain socket, in which typed events pass
// as a protocol allows. Connections, listeners and sessions are handles of one number space; 0 stands for
// none. A handle that is closed or was never given out makes an operation fail with VK_BUS_NO_HANDLE,
// whatever other threads do meanwhile.
//
// A child process has nothing of its parent's: it may close what it finds, which the parent does not notice,
// and opens its own.
//
// Operations may be called from any thread, out of callbacks too; they hold no lock while they wait or call
// back. Events of one connection are delivered in their order as long as one thread at a time processes it.

/// Results of the operations, and reasons of the close callback.
enum VkBusResult : unsigned {
    VK_BUS_DONE = 0,
    VK_BUS_NO_HANDLE = 1,       // no such handle, or it was closed
    VK_BUS_TIMED_OUT = 2,       // nothing came in time
    VK_BUS_LOST = 3,            // the other end is gone, or the connection broke
    VK_BUS_NO_SERVICE = 4,      // nobody listens on the address
    VK_BUS_ADDRESS_IN_USE = 5,  // somebody else does
    VK_BUS_BAD_ADDRESS = 6,     // it is too long, or its folder or file is not ours to use
    VK_BUS_WRONG_USER = 7,      // the other end belongs to another user
    VK_BUS_REFUSED = 8,         // the other end does not want the session
    VK_BUS_BAD_TYPE = 9,        // the type library lacks or misdescribes what is wanted
    VK_BUS_NOT_ALLOWED = 10,    // the protocol does not allow that now
    VK_BUS_BAD_EVENT = 11,      // an event that does not follow its description, or was not handled
    VK_BUS_TOO_LARGE = 12,      // more than maxVkBusEventBytesG
    VK_BUS_QUEUE_FULL = 13,     // the other end does not read
    VK_BUS_SYSTEM = 14,         // a system call failed, mostly for want of descriptors
};

/// A few words for a result; constant text.
const char* VkBusResultText(unsigned result);

/// Largest event, marshalled: the largest message of the layer above has 24 bytes of first line, 1 MiB of
/// headers and 5 MiB of body. Checked at both ends.
constexpr uint32_t maxVkBusEventBytesG = 8u << 20;
/// Most bytes that wait in one session for the other end to read, beside what the kernel holds; each event
/// counts for vkBusEventOverheadG more than it has.
constexpr uint32_t maxVkBusQueuedBytesG = 16u << 20;
constexpr uint32_t vkBusEventOverheadG = 1024;
/// Most sessions of a listener, and of one process with it; further ones are closed at once. Processes in
/// containers, whose numbers are not ours, count as one.
constexpr unsigned maxVkBusSessionsG = 256;
constexpr unsigned maxVkBusSessionsOfProcessG = 32;
/// Nanoseconds that the opening of a session may take, at either end.
constexpr int64_t vkBusOpeningLimitG = 5'000'000'000;
/// Nanoseconds for which a client's send waits for the service to take what the kernel does not hold.
constexpr int64_t vkBusSendLimitG = 1'000'000'000;

/// An event has come in; called out of VkBusProcessOneEvent. The two words are for the VkMarshal operations,
/// on this thread, until the callback returns. Gives 0 when the event was handled; anything else closes the
/// session.
using VkBusEventCallback = unsigned (*)(uint32_t session, uintptr_t word1, uintptr_t word2, void* context);
/// The session is over and its handle gone, for a reason of VkBusResult. Called once, out of
/// VkBusProcessOneEvent, unless this end closed the session itself.
using VkBusCloseCallback = void (*)(uint32_t session, uintptr_t reason, void* context);
/// A client of that name asks for a session of the listener's protocol. Gives 0 to take it; the client may
/// send then.
using VkBusAcceptCallback = unsigned (*)(uint32_t session, const char* clientName, void* context);

/// Sets the path of the socket for what is opened later; null, as at the start, stands for the default: what
/// the environment says in SORN_BUS, else "sorn-bus" in the folder XDG_RUNTIME_DIR, in /run/user/UID where
/// that exists, or in /tmp/sorn-UID, which a listener makes and which must belong to the user alone.
void VkBusSetAddress(const char* path);
/// The path that is set, or the default one; of one that is too long for a socket, the beginning.
std::string VkBusGetAddress();

/// Connects to the service on the address under a name (at most 255 bytes of UTF-8) that the service is told,
/// and stores the handle. Waits only while too many others want to connect, for vkBusOpeningLimitG at most.
/// The library is kept, not copied.
unsigned VkBusOpenNamedConnection(const VkBusTypeLibrary& library, const char* name, uint32_t* connection);

/// Opens a session of a protocol and stores its handle; waits for the service's answer for up to
/// vkBusOpeningLimitG. VK_BUS_REFUSED when the service does not have that protocol with that checksum. A
/// connection carries one session in its life. Nothing is stored on a failure.
unsigned VkBusOpenSession(uint32_t connection, unsigned protocolId, unsigned checksum,
                          VkBusEventCallback eventCallback, VkBusCloseCallback closeCallback, void* context,
                          unsigned reserved, uint32_t* session);

/// Marshals the record, laid out as the descriptor of the event's structure says, and sends it. On a failure
/// nothing was sent. A client waits for up to vkBusSendLimitG while the service does not read; what it has
/// not taken by then stays in the queue and goes on with VkBusProcessOneEvent or the next send. A service
/// never waits: a session whose queue is full is closed.
unsigned VkBusMarshalAndSend(uint32_t session, unsigned eventId, const void* record);

/// A descriptor that is readable when VkBusProcessOneEvent has something to do for the connection or
/// listener; -1 for an unknown handle. It stays the same and belongs to the bus: watch it, level-triggered,
/// and do nothing else with it.
int VkBusGetSelectFd(uint32_t connection);

/// Handles one event of the connection or listener: calls the callback that it is for. Without a limit it
/// does what is ready, if anything is, and gives 0. With one it waits for an event for at most that many
/// nanoseconds. Anything but 0 means that nothing came in time, or that the connection is lost or was closed;
/// a listener lives on when sessions end.
unsigned VkBusProcessOneEvent(uint32_t connection, const int64_t* limitNanoseconds);

/// Closes the session; what the other end's kernel has not taken yet is dropped. No callback begins
/// afterwards, but for an event that another thread has taken out already.
unsigned VkBusCloseSession(uint32_t session);
/// Closes the connection, or stops listening, and closes its sessions in the same way.
unsigned VkBusCloseConnection(uint32_t connection);

/// Closes every connection and listener of the process: for the end of the module.
void VkBusCloseAll();

/// Listens on the address for sessions of one protocol of the library and stores the listener's handle, to be
/// used like a connection. A socket that nobody listens on is replaced. The accept callback may be null: all
/// are taken.
unsigned VkBusListen(const VkBusTypeLibrary& library, unsigned protocolId, unsigned checksum,
                     VkBusAcceptCallback acceptCallback, VkBusEventCallback eventCallback,
                     VkBusCloseCallback closeCallback, void* context, uint32_t* listener);

/// The id of the event that an event callback was called for, given its third word and its second; 0 if they
/// are not of an event whose callback runs on this thread.
unsigned VkMarshal_GetTypeFromSerialEvent(uintptr_t word2, uintptr_t word1);
/// The same event's record, which belongs to the bus and lives until the callback returns, or as long as what
/// VkMarshal_KeepSerialEvent gives. Nothing is stored
/// on a failure. The library is the one of the connection.
unsigned VkMarshal_UnmarshalSerialEvent(const VkBusTypeLibrary& library, uintptr_t word2, uintptr_t word1,
                                        const void** record);
/// What the same event's record lives as long as, so that a large one need not be copied: the caller's
/// reference, which any thread may drop, after the end of the session and the connection, too. Null for no
/// event whose callback runs on this thread, and from a bus that cannot do that.
ref<RoxCore> VkMarshal_KeepSerialEvent(uintptr_t word2, uintptr_t word1);
