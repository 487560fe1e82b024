#include "rox/RoxActivityRun.h"

#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <systemd/sd-event.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "rox/RoxActivity.h"
#include "rox/RoxAssert.h"
#include "rox/RoxFd.h"
#include "rox/RoxMutexHold.h"
#include "rox/RoxSpinLock.h"
#include "rox/RoxSpinLockHold.h"

namespace {

__thread RoxActivityRun* pCurrentG __attribute__((tls_model("initial-exec")));

// All that run. Nothing here is destroyed when the process ends, for activities may run until then.
constinit RoxSpinLock runningLockG{1};
constinit RoxActivityRun* pRunningG = nullptr;
constinit std::atomic<uint32_t> nRunningG{0};

// Set while all are being ended: one that starts meanwhile ends too.
constinit bool fEndAllG = false;

int IgnoreWake(sd_event_source*, int, uint32_t, void*) {
    return 0;
}

}  // namespace

RoxActivityRun::RoxActivityRun(RoxActivity* activity, const ref<RoxSemaphoreState>& stop,
                               const ref<RoxSemaphoreState>& stopped, const ref<RoxSemaphoreState>& started)
    : activityM(activity), stopM(stop), stoppedM(stopped), startedM(started) {
    RoxAssert(stop == nullptr || (stop != stopped && stop != started),
              "RoxActivity: the semaphore `stop` is another one too");
}

RoxActivityRun::~RoxActivityRun() = default;

RoxActivityRun* RoxActivityRun::Current() {
    return pCurrentG;
}

bool RoxActivityRun::FEndsHere(const RoxSemaphoreState& semaphore) {
    return pCurrentG != nullptr && pCurrentG->stoppedM == &semaphore;
}

RoxActivity* RoxActivityRun::GetActivity() const {
    return activityM.get();
}

void RoxActivityRun::Start() {
    Enter();
    if (stopM != nullptr) {
        stopM->SetWatcher(this);
        stopM = nullptr;
    }
    UpRef();  // the thread's
    RoxThread::Start(activityM->GetName().Utf8(), ThreadMain, this);
}

void RoxActivityRun::ThreadMain(void* run) {
    auto* self = static_cast<RoxActivityRun*>(run);
    self->Run();
    RoxCore::DownRef(self);
}

void RoxActivityRun::Run() {
    pCurrentG = this;
    if (priorityM != RoxThread::PRIORITY_NORMAL) {
        RoxThread::SetPriority(priorityM);
    }
    OpenLoop();
    activityM->ActivityStart();
    if (startedM != nullptr) {
        startedM->Release();
    }
    Loop();
    activityM->ActivityStop();
    CloseLoop();
    activityM = nullptr;
    pCurrentG = nullptr;
    TellEnd();
    Leave();
}

void RoxActivityRun::OpenLoop() {
    Check(sd_event_new(&pEventM), "no event loop");
    const int wakeFd = eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
    Check(wakeFd < 0 ? -errno : 0, "no event descriptor");
    Check(sd_event_add_io(pEventM, nullptr, wakeFd, EPOLLIN, IgnoreWake, nullptr), "not watched");
    RoxMutexHold hold(mutexM);
    wakeFdM = wakeFd;
}

void RoxActivityRun::Loop() {
    while (!FEnding()) {
        int ready = sd_event_prepare(pEventM);
        if (ready == 0) {
            ready = sd_event_wait(pEventM, UINT64_MAX);
        }
        Check(ready, "event loop");
        if (ready > 0) {
            activityM->BeforeCallbacksRun();
            Check(sd_event_dispatch(pEventM), "event loop");
            activityM->AfterCallbacksRun();
        }
    }
}

void RoxActivityRun::CloseLoop() {
    while (pFirstFdM != nullptr) {
        pFirstFdM->ClearFd();
    }
    pEventM = sd_event_unref(pEventM);
    RoxMutexHold hold(mutexM);
    close(wakeFdM);
    wakeFdM = -1;
}

void RoxActivityRun::End() {
    fEndM.store(true, std::memory_order_release);
    RoxMutexHold hold(mutexM);
    if (wakeFdM >= 0 && pCurrentG != this) {
        eventfd_write(wakeFdM, 1);
    }
}

void RoxActivityRun::SemaphoreReleased() {
    bool fAnswer = false;
    {
        RoxMutexHold hold(mutexM);
        ++nAskedM;
        fAnswer = (fEndedM || pCurrentG == this) && nAnsweredM < nAskedM;
        nAnsweredM += fAnswer ? 1 : 0;
    }
    End();
    if (fAnswer && stoppedM != nullptr) {
        stoppedM->Release();
    }
}

/// What has not been answered yet, and at least one.
void RoxActivityRun::TellEnd() {
    unsigned nReleases = 0;
    {
        RoxMutexHold hold(mutexM);
        fEndedM = true;
        nReleases = std::max(nAskedM, 1u) - nAnsweredM;
        nAnsweredM += nReleases;
    }
    for (; stoppedM != nullptr && nReleases > 0; --nReleases) {
        stoppedM->Release();
    }
}

void RoxActivityRun::SetPriority(RoxThread::Priority priority) {
    if (pCurrentG == this) {
        RoxThread::SetPriority(priority);
    } else {
        priorityM = priority;
    }
}

void RoxActivityRun::Enlist(RoxFd* fd) {
    fd->pRunM = this;
    fd->pNextM = pFirstFdM;
    fd->ppThisM = &pFirstFdM;
    if (pFirstFdM != nullptr) {
        pFirstFdM->ppThisM = &fd->pNextM;
    }
    pFirstFdM = fd;
}

void RoxActivityRun::Delist(RoxFd* fd) {
    *fd->ppThisM = fd->pNextM;
    if (fd->pNextM != nullptr) {
        fd->pNextM->ppThisM = fd->ppThisM;
    }
    fd->pRunM = nullptr;
}

void RoxActivityRun::Enter() {
    RoxSpinLockHold hold(runningLockG);
    pNextM = pRunningG;
    ppThisM = &pRunningG;
    if (pNextM != nullptr) {
        pNextM->ppThisM = &pNextM;
    }
    pRunningG = this;
    nRunningG.fetch_add(1, std::memory_order_relaxed);
    if (fEndAllG) {
        End();
    }
}

void RoxActivityRun::Leave() {
    {
        RoxSpinLockHold hold(runningLockG);
        *ppThisM = pNextM;
        if (pNextM != nullptr) {
            pNextM->ppThisM = ppThisM;
        }
    }
    nRunningG.fetch_sub(1, std::memory_order_release);
    nRunningG.notify_all();
}

void RoxActivityRun::EndAll() {
    {
        RoxSpinLockHold hold(runningLockG);
        fEndAllG = true;
        for (RoxActivityRun* each = pRunningG; each != nullptr; each = each->pNextM) {
            each->End();
        }
    }
    const uint32_t nOwn = pCurrentG != nullptr ? 1 : 0;
    for (uint32_t n; (n = nRunningG.load(std::memory_order_acquire)) > nOwn;) {
        nRunningG.wait(n, std::memory_order_acquire);
    }
    RoxSpinLockHold hold(runningLockG);
    fEndAllG = false;
}

void RoxActivityRun::Check(int result, const char* what) const {
    if (result < 0) {
        RoxAssertFail("RoxActivity %s: %s: %s", activityM->GetName().Utf8(), what, strerror(-result));
    }
}
