// The library's probe worker on the host clock: its time is trace time and its sleeps and waits
// go through HostClock, so each pass runs at the exact trace time it would on a device, whether
// the replay is paced by the wall clock or not.
//
// One per probe worker, made by the factory the host layer installs (HostEnvironment) when the
// worker is built, i.e. while the server initialises; it attaches the worker to the clock as
// busy, so the replay waits for its first pass. Called by the worker and, for now() and
// signal(), by host threads with the worker's mutex held.
#pragma once

#include "host/time/HostClock.h"
#include "probe/ProbeClock.h"

namespace velmora {

class HostProbeClock : public ProbeClock {
public:
    explicit HostProbeClock(HostClock& clock);
    ~HostProbeClock() override;

    int64_t now() override;
    void sleepMs(int64_t ms) override;
    void wait(android::Condition& cond, android::Mutex& lock) override;
    void signal(android::Condition& cond) override;
    void wakeForExit() override;

private:
    HostClock& mClock;
    const int mWorkerId;
};

}  // namespace velmora
