#pragma once

#include "rox/RoxCore.h"
#include "rox/RoxFdEvent.h"
#include "rox/RoxListenerInterface.h"

struct sd_event_source;
class RoxActivityRun;

/// A descriptor that an activity watches. All operations that change what is watched, and the destruction of
/// one that watches, belong to the thread of the activity that called SetFd; anything else ends in
/// RoxAssertFail. When the activity ends, it clears what it still watches, after ActivityStop.
class RoxFd : public RoxCore {
 public:
    /// The one value for SetFd's `events`: something can be read, or the other end is gone, or an error
    /// waits.
    static constexpr int eventReadableG = 2;

    RoxFd() = default;
    ~RoxFd() override;

    /// Watches `fd`, which stays the caller's; instead of the one before, if there was one. The listener
    /// stays. Clear it before the descriptor is closed. False when the system cannot watch it (it is not
    /// open, it is a file, the activity listens to it already): then nothing is watched.
    bool SetFd(int fd, int events);
    /// Ends the watch. The listener is not called again unless SetFd is.
    void ClearFd();

    /// Who is called, on the activity's thread, each time the loop finds the descriptor ready: once and again
    /// until it has been read empty. Borrowed until ClearListener, or until another takes its place. Any
    /// thread while nothing is watched.
    void SetListener(RoxListenerInterface<RoxFdEvent>* listener);
    /// The listener is not called again, even if the descriptor is ready now.
    void ClearListener();

    /// The descriptor that is watched; -1 for none.
    int GetFd() const { return fdM; }

 private:
    friend class RoxActivityRun;
    static int OnReady(sd_event_source* source, int fd, unsigned events, void* self);
    void AssertOwnThread() const;
    void ListenIfSet();

    int fdM = -1;
    RoxListenerInterface<RoxFdEvent>* pListenerM = nullptr;
    // While watched: the activity's, and the place in its list.
    RoxActivityRun* pRunM = nullptr;
    sd_event_source* pSourceM = nullptr;
    RoxFd* pNextM = nullptr;
    RoxFd** ppThisM = nullptr;
};
