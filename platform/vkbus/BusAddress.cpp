#include "vkbus/BusAddress.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <time.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>

#include "rox/RoxMutexHold.h"
#include "vkbus/BusLockLevel.h"

namespace {

constexpr int nBacklogG = 128;
// How often, and after how many nanoseconds each, the folder's lock is tried; it is held for the time of a
// bind.
constexpr int nLockAttemptsG = 100;
constexpr long lockIntervalG = 10'000'000;

struct SetPath {
    RoxMutex mutex{BusLockLevel::addressG};
    char path[sizeof(sockaddr_un::sun_path) + 1] = "";
};

SetPath& Setting() {
    // Never destroyed: threads may use the bus until the end of the process.
    alignas(SetPath) static unsigned char memory[sizeof(SetPath)];
    static SetPath* const setting = new (memory) SetPath;
    return *setting;
}

int NewSocket(int flags) {
    return socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | flags, 0);
}

bool FOwnDirectory(const char* path, mode_t forbidden) {
    struct stat found;
    return lstat(path, &found) == 0 && S_ISDIR(found.st_mode) && found.st_uid == geteuid() &&
           (found.st_mode & forbidden) == 0;
}

}  // namespace

void BusAddress::Set(const char* path) {
    SetPath& setting = Setting();
    RoxMutexHold hold(setting.mutex);
    snprintf(setting.path, sizeof(setting.path), "%s", path != nullptr ? path : "");
}

BusAddress::BusAddress() : addressM{}, fOwnFolderM(false) {
    addressM.sun_family = AF_UNIX;
    const size_t size = sizeof(addressM.sun_path);
    int length;
    const char* runtime = secure_getenv("XDG_RUNTIME_DIR");
    const char* chosen = secure_getenv("SORN_BUS");
    char ofUser[32];
    snprintf(ofUser, sizeof(ofUser), "/run/user/%u", geteuid());
    SetPath& setting = Setting();
    RoxMutexHold hold(setting.mutex);
    if (setting.path[0] != 0) {
        length = snprintf(addressM.sun_path, size, "%s", setting.path);
    } else if (chosen != nullptr && chosen[0] != 0) {
        length = snprintf(addressM.sun_path, size, "%s", chosen);
    } else if (runtime != nullptr && runtime[0] == '/') {
        length = snprintf(addressM.sun_path, size, "%s/sorn-bus", runtime);
    } else if (FOwnDirectory(ofUser, 0)) {
        length = snprintf(addressM.sun_path, size, "%s/sorn-bus", ofUser);
    } else {
        length = snprintf(addressM.sun_path, size, "/tmp/sorn-%u/sorn-bus", geteuid());
        fOwnFolderM = true;
    }
    fFitsM = length > 0 && static_cast<size_t>(length) < size;
}

bool BusAddress::FOurUser(const BusFd& connected, pid_t* process) {
    ucred peer;
    socklen_t size = sizeof(peer);
    if (getsockopt(connected.Get(), SOL_SOCKET, SO_PEERCRED, &peer, &size) != 0) {
        return false;
    }
    if (process != nullptr) {
        *process = peer.pid;
    }
    return peer.uid == geteuid() || peer.uid == 0;
}

unsigned BusAddress::Connect(BusFd& connected) const {
    if (!fFitsM) {
        return VK_BUS_BAD_ADDRESS;
    }
    // Only a socket that waits can wait for its place in a queue that is full; it may do so for a while.
    BusFd fd(NewSocket(0));
    const timeval limit = {vkBusOpeningLimitG / 1'000'000'000, 0};
    if (!fd.FOpen() || setsockopt(fd.Get(), SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof(limit)) != 0) {
        return VK_BUS_SYSTEM;
    }
    int result;
    do {
        result = connect(fd.Get(), reinterpret_cast<const sockaddr*>(&addressM), sizeof(addressM));
    } while (result != 0 && errno == EINTR);
    if (result != 0) {
        switch (errno) {
            case EACCES:
            case EPERM:
                return VK_BUS_WRONG_USER;
            case EAGAIN:
                return VK_BUS_TIMED_OUT;
            default:
                return VK_BUS_NO_SERVICE;
        }
    }
    if (!FOurUser(fd)) {
        return VK_BUS_WRONG_USER;
    }
    connected = std::move(fd);
    return VK_BUS_DONE;
}

unsigned BusAddress::Listen(BusFd& listening) {
    BusFd folder;
    if (!fFitsM || !MakeFolder() || !OpenFolderLocked(folder)) {
        return VK_BUS_BAD_ADDRESS;
    }
    const unsigned result = RemoveStale();
    return result == VK_BUS_DONE ? Bind(listening) : result;
}

bool BusAddress::MakeFolder() const {
    if (!fOwnFolderM) {
        return true;
    }
    char folder[sizeof(addressM.sun_path)];
    snprintf(folder, sizeof(folder), "%.*s", static_cast<int>(strrchr(Path(), '/') - Path()), Path());
    return (mkdir(folder, 0700) == 0 || errno == EEXIST) && FOwnDirectory(folder, 0077);
}

bool BusAddress::OpenFolderLocked(BusFd& folder) const {
    const char* slash = strrchr(Path(), '/');
    char path[sizeof(addressM.sun_path)] = ".";
    if (slash != nullptr) {
        snprintf(path, sizeof(path), "%.*s", static_cast<int>(slash - Path()) + 1, Path());
    }
    BusFd fd(open(path, O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!fd.FOpen()) {
        return false;
    }
    for (int i = 0; i < nLockAttemptsG; ++i) {
        if (flock(fd.Get(), LOCK_EX | LOCK_NB) == 0) {
            folder = std::move(fd);
            return true;
        }
        const timespec interval = {0, lockIntervalG};
        nanosleep(&interval, nullptr);
    }
    return false;
}

// Nothing that lives, and nothing that is no socket, is removed.
unsigned BusAddress::RemoveStale() const {
    struct stat found;
    if (lstat(Path(), &found) != 0) {
        return errno == ENOENT ? VK_BUS_DONE : VK_BUS_BAD_ADDRESS;
    }
    BusFd probe(NewSocket(SOCK_NONBLOCK));
    if (!S_ISSOCK(found.st_mode)) {
        return VK_BUS_BAD_ADDRESS;
    }
    if (!probe.FOpen()) {
        return VK_BUS_SYSTEM;
    }
    if (connect(probe.Get(), reinterpret_cast<const sockaddr*>(&addressM), sizeof(addressM)) == 0 ||
        errno != ECONNREFUSED) {
        return VK_BUS_ADDRESS_IN_USE;
    }
    return unlink(Path()) == 0 || errno == ENOENT ? VK_BUS_DONE : VK_BUS_BAD_ADDRESS;
}

unsigned BusAddress::Bind(BusFd& listening) {
    BusFd fd(NewSocket(SOCK_NONBLOCK));
    // The path gets the mode that the socket has before it is bound.
    if (!fd.FOpen() || fchmod(fd.Get(), 0600) != 0) {
        return VK_BUS_SYSTEM;
    }
    if (bind(fd.Get(), reinterpret_cast<const sockaddr*>(&addressM), sizeof(addressM)) != 0) {
        return errno == EADDRINUSE ? VK_BUS_ADDRESS_IN_USE : VK_BUS_BAD_ADDRESS;
    }
    struct stat bound;
    if (lstat(Path(), &bound) != 0 || listen(fd.Get(), nBacklogG) != 0) {
        unlink(Path());
        return VK_BUS_SYSTEM;
    }
    deviceM = bound.st_dev;
    inodeM = bound.st_ino;
    listening = std::move(fd);
    return VK_BUS_DONE;
}

void BusAddress::Remove() const {
    BusFd folder;
    struct stat found;
    if (OpenFolderLocked(folder) && lstat(Path(), &found) == 0 && found.st_dev == deviceM &&
        found.st_ino == inodeM) {
        unlink(Path());
    }
}
