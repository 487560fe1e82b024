#pragma once

#include <sys/types.h>
#include <sys/un.h>

#include "vkbus/BusFd.h"
#include "vkbus/VkBus.h"

/// Where a service is found: the path of its socket. A value, made anew for each use from what is set at that
/// moment.
class BusAddress {
 public:
    /// Sets the path for the process; null for the default. Any thread.
    static void Set(const char* path);

    /// The path that is set, else the default one (see VkBusSetAddress).
    BusAddress();

    const char* Path() const { return addressM.sun_path; }

    /// A socket connected to the service, whose user is us or root. Waits only while
    /// the service has more callers than its queue holds, for vkBusOpeningLimitG at most.
    unsigned Connect(BusFd& connected) const;
    /// A socket that listens on the path, with mode 0600. Replaces one that nobody listens on; starting
    /// services take turns.
    unsigned Listen(BusFd& listening);
    /// Removes the path of the socket that Listen made, if it is still that socket's.
    void Remove() const;

    /// Whether the process at the other end of a connected socket belongs to our user or to root. Gives the
    /// process, 0 for one of other numbers than ours.
    static bool FOurUser(const BusFd& connected, pid_t* process = nullptr);

 private:
    bool MakeFolder() const;
    bool OpenFolderLocked(BusFd& folder) const;
    unsigned RemoveStale() const;
    unsigned Bind(BusFd& listening);

    sockaddr_un addressM;
    bool fFitsM;
    bool fOwnFolderM;   // in a folder of /tmp that we make and check
    dev_t deviceM = 0;  // of the bound path
    ino_t inodeM = 0;
};
