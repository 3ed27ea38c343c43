#include "host/time/HostProbeClock.h"

#include "config/CommandIds.h"

namespace velmora {

namespace {

// A boosted thread's lifetime: a polling worker must look at the queues again this long after
// any timestamp it or a host thread took.
constexpr int64_t kBoostLifetimeUs = int64_t{kProbeBoostLifetimeMs} * 1000;
// Trace time starts at 0, but a probe timestamp of 0 means "withdrawn": the worker's time runs
// one second ahead of trace time.
constexpr int64_t kEpochNs = 1000 * 1000 * 1000;

}  // namespace

HostProbeClock::HostProbeClock(HostClock& clock)
    : mClock(clock), mWorkerId(clock.attachWorker(kBoostLifetimeUs)) {}

HostProbeClock::~HostProbeClock() {
    mClock.detachWorker(mWorkerId);
}

int64_t HostProbeClock::now() {
    return kEpochNs + mClock.workerNowUs(mWorkerId) * 1000;
}

void HostProbeClock::sleepMs(int64_t ms) {
    mClock.workerSleep(mWorkerId, ms);
}

void HostProbeClock::wait(android::Condition& /*cond*/, android::Mutex& lock) {
    // The worker's mutex is held on entry and on return; in between the clock lets it go.
    auto release = [&lock]() NO_THREAD_SAFETY_ANALYSIS { lock.unlock(); };
    auto reacquire = [&lock]() NO_THREAD_SAFETY_ANALYSIS { lock.lock(); };
    mClock.workerWait(mWorkerId, release, reacquire);
}

void HostProbeClock::signal(android::Condition& /*cond*/) {
    // The worker waits on the clock, never on its condition.
    mClock.workerSignal(mWorkerId);
}

void HostProbeClock::wakeForExit() {
    mClock.workerExit(mWorkerId);
}

}  // namespace velmora
