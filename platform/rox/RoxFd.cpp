#include "rox/RoxFd.h"

#include <sys/epoll.h>
#include <systemd/sd-event.h>

#include "rox/RoxActivityRun.h"
#include "rox/RoxAssert.h"

RoxFd::~RoxFd() {
    ClearFd();
}

bool RoxFd::SetFd(int fd, int events) {
    RoxAssert(events == eventReadableG, "RoxFd: descriptors are watched for reading only");
    RoxActivityRun* run = RoxActivityRun::Current();
    RoxAssert(run != nullptr, "RoxFd: SetFd outside of an activity's thread");
    ClearFd();
    if (sd_event_add_io(run->GetEvent(), &pSourceM, fd, EPOLLIN, OnReady, this) < 0) {
        pSourceM = nullptr;
        return false;
    }
    fdM = fd;
    run->Enlist(this);
    ListenIfSet();
    return pSourceM != nullptr;
}

void RoxFd::ClearFd() {
    if (pSourceM == nullptr) {
        return;
    }
    AssertOwnThread();
    pRunM->Delist(this);
    pSourceM = sd_event_source_disable_unref(pSourceM);
    fdM = -1;
}

void RoxFd::SetListener(RoxListenerInterface<RoxFdEvent>* listener) {
    pListenerM = listener;
    if (pSourceM != nullptr) {
        AssertOwnThread();
        ListenIfSet();
    }
}

void RoxFd::ClearListener() {
    SetListener(nullptr);
}

void RoxFd::AssertOwnThread() const {
    RoxAssert(pRunM == RoxActivityRun::Current(), "RoxFd: changed outside of its activity's thread");
}

/// Without a listener nothing is polled: a descriptor that stays ready would keep the loop busy.
void RoxFd::ListenIfSet() {
    if (sd_event_source_set_enabled(pSourceM, pListenerM != nullptr ? SD_EVENT_ON : SD_EVENT_OFF) < 0) {
        ClearFd();
    }
}

int RoxFd::OnReady(sd_event_source*, int, unsigned, void* self) {
    const auto* fd = static_cast<RoxFd*>(self);
    if (fd->pListenerM != nullptr && !fd->pRunM->FEnding()) {
        fd->pListenerM->Call();
    }
    return 0;
}
