#include "rox/RoxActivity.h"

#include "rox/RoxActivityRun.h"
#include "rox/RoxAssert.h"

namespace {

__thread RoxActivity::CreationScopePrivate* pScopeG __attribute__((tls_model("initial-exec")));

ref<RoxSemaphoreState> StateOf(const ref<RoxCoreSemaphore>& semaphore) {
    return semaphore != nullptr ? semaphore->GetInternal().GetState() : nullptr;
}

}  // namespace

RoxInitInfo RoxActivity::initInfo("RoxActivity", nullptr, RoxActivityRun::EndAll, 0, nullptr, 0, nullptr);

const char RoxActivity::classTagG = 0;

RoxActivity::CreationScopePrivate::CreationScopePrivate() : pOuterM(pScopeG), pEndM(&firstM) {
    pScopeG = this;
}

RoxActivity::CreationScopePrivate::~CreationScopePrivate() {
    pScopeG = pOuterM;
    while (firstM != nullptr) {
        const ref<RoxActivityRun> run = std::move(firstM);
        firstM = std::move(run->nextCreatedM);
        run->Start();
    }
}

void RoxActivity::CreationScopePrivate::Add(const ref<RoxActivityRun>& run) {
    *pEndM = run;
    pEndM = &run->nextCreatedM;
}

RoxActivity::RoxActivity(const char* name, RoxInitInfo* module, const ref<RoxCoreSemaphore>& stop,
                         const ref<RoxCoreSemaphore>& stopped, const ref<RoxCoreSemaphore>&,
                         const ref<RoxCoreSemaphore>& started)
    : nameM(pMempoolM, name),
      pInitInfoM(module),
      runM(new RoxActivityRun(this, StateOf(stop), StateOf(stopped), StateOf(started))) {
    if (pScopeG == nullptr) {
        RoxAssertFail("RoxActivity %s: created outside of a CreationScopePrivate", name);
    }
    pScopeG->Add(runM);
}

RoxActivity::~RoxActivity() = default;

RoxActivity* RoxActivity::Current() {
    const RoxActivityRun* run = RoxActivityRun::Current();
    return run != nullptr ? run->GetActivity() : nullptr;
}

void RoxActivity::Done() {
    runM->End();
}

void RoxActivity::SetPriority(RoxThread::Priority priority) {
    runM->SetPriority(priority);
}

void* RoxActivity::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : RoxCore::VkCastHelper(classTag);
}

void RoxActivity::ActivityStart() {}
void RoxActivity::ActivityStop() {}
int64_t RoxActivity::IdleTimeoutHint() {
    return 0;
}
unsigned RoxActivity::CallMeCountHint() {
    return 0;
}
unsigned RoxActivity::FdCountHint() {
    return 0;
}
unsigned RoxActivity::SemaphoreCountHint() {
    return 0;
}
unsigned RoxActivity::TimerCountHint() {
    return 0;
}
int64_t RoxActivity::BlockedTimeoutHint() {
    return 0;
}
int64_t RoxActivity::FrozenTimeoutHint() {
    return 0;
}
void RoxActivity::BeforeCallbacksRun() {}
void RoxActivity::AfterCallbacksRun() {}
