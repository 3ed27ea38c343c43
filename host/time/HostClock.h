// The clock of the host platform layer: trace time since the last restart.
//
// Real-time mode follows the steady clock, optionally sped up (speed 10 runs ten trace
// milliseconds per real millisecond). Virtual mode never waits: sleepMs and advanceTo move the
// time forward at once, so a replay in virtual mode is deterministic.
//
// Everything on the host that waits goes through this clock:
// - listeners with deadlines (the timed-action scheduler): a virtual advance stops at each of
//   their deadlines on the way and runs them there;
// - workers (the library's probe worker, through HostProbeClock): threads that sleep and wait
//   on the clock. A virtual advance first lets every worker finish the pass it is making, then
//   stops at every instant a worker wakes (the end of its sleep), and, for a worker that polls,
//   at every instant it asked to look at. Time never moves while a worker is busy.
// Real time behaves the same way with real waiting in between: trace time stops at any of those
// instants until the worker concerned has been there (and at the hold a replay sets at its
// next call), so a busy machine stretches the replay rather than reorders it.
// The mode is chosen while no worker is attached (before a server is built).
//
// Thread safe. mLock is never held while listeners run; lock order: a listener's own lock
// before mLock, and the probe worker's mutex before mLock.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <vector>

namespace velmora {

class HostClock {
public:
    static constexpr int64_t kNoDeadline = INT64_MAX;
    // How often a real-time wait for a busy worker looks again (it is also woken at once).
    static constexpr std::chrono::milliseconds kRealPoll{1};

    HostClock();

    // Real time at `speed` trace milliseconds per real millisecond (speed > 0). Restarts at 0.
    void setRealTime(double speed);
    // Virtual time, starting at 0.
    void setVirtual();
    bool isVirtual() const;
    double speed() const;
    // Sets the time back to 0 without changing the mode.
    void restart();

    int64_t nowMs() const;
    int64_t nowUs() const;
    // Waits `ms` of trace time (real mode) or advances by it (virtual mode).
    void sleepMs(int64_t ms);
    // Waits or advances until trace time `ms`; a time that has passed does not wait. In virtual
    // mode it still lets busy workers finish their pass first. In both modes what fell due up
    // to the time reached has run when it returns (in real time the listeners' own threads may
    // be a moment late; the waiting thread then runs them itself).
    void advanceTo(int64_t ms);
    // Real time: trace time stops at `ms` (kNoDeadline: nowhere) until the next holdAt, and then
    // goes on from there. A replay holds it at its next call, so a replay that falls behind
    // (a busy machine) stretches real time instead of making its calls late: every call
    // happens at its own trace time, and what is armed there falls due at the trace time it
    // would have. No effect in virtual mode.
    void holdAt(int64_t ms);
    // Real duration of `ms` trace milliseconds (zero in virtual mode).
    std::chrono::nanoseconds toReal(int64_t ms) const;

    // `onAdvance` runs after every virtual step and after every real wait; `nextDeadlineMs` tells
    // the earliest trace time the listener has business at (kNoDeadline for none). Returns an id
    // for removeListener.
    int addListener(std::function<void()> onAdvance, std::function<int64_t()> nextDeadlineMs);
    void removeListener(int id);

    // Worker side. attachWorker registers a worker that is about to make its first pass;
    // `lookAheadUs` is how long after any time it reads (workerNowUs) it may have business.
    int attachWorker(int64_t lookAheadUs);
    void detachWorker(int id);
    int64_t workerNowUs(int id);
    // Sleeps `ms` (real) or until `ms` from now (virtual); 0 polls: in virtual time the worker
    // is woken at the next instant it looked ahead to, or when signalled.
    void workerSleep(int id, int64_t ms);
    // Virtual mode: blocks until signalled. `release` runs once the worker is known to be
    // waiting, `reacquire` before returning (the caller's own mutex).
    void workerWait(int id, const std::function<void()>& release,
                    const std::function<void()>& reacquire);
    // Real mode: the worker waits on its own condition between these two.
    void workerWaiting(int id);
    void workerResumed(int id);
    // Work arrived: a waiting or polling worker makes a pass before time moves on.
    void workerSignal(int id);
    // The worker is leaving: nothing blocks it any more and nobody waits for it.
    void workerExit(int id);

private:
    struct Listener {
        std::function<void()> onAdvance;
        std::function<int64_t()> nextDeadlineMs;
    };
    enum class WorkerState { Busy, Sleeping, Polling, Waiting };
    struct Worker {
        WorkerState state = WorkerState::Busy;
        int64_t wakeUs = 0;      // Sleeping: when it wakes
        int64_t busyFromUs = 0;  // Busy: when its pass began
        int64_t lookAheadUs = 0;
        bool exiting = false;
    };
    using Listeners = std::vector<Listener>;

    // Real time: the earliest instant someone still has business at (the hold, a busy
    // worker's pass, a sleeper's wake-up, a poller's next look); trace time stops there.
    int64_t holdLocked() const;
    int64_t nowUsLocked() const;
    void waitReal(int64_t targetUs);
    std::chrono::nanoseconds realDurationLocked(int64_t traceUs) const;
    void setStateLocked(Worker& worker, WorkerState state);
    int64_t realUsLocked() const;
    void runListeners();
    void advanceVirtual(int64_t targetUs);
    bool anyBusyLocked() const;
    // Wakes the workers due at the current virtual time; true when one was woken.
    bool wakeDueLocked();

    mutable std::mutex mLock;  // guards everything below; never held while listeners run
    std::condition_variable mWorkersChanged;  // any worker's state changed
    bool mVirtual = false;
    double mSpeed = 1.0;
    // Moves on while trace time is held (see nowUsLocked), hence mutable.
    mutable std::chrono::steady_clock::time_point mStart;
    int64_t mHoldUs = kNoDeadline;
    int64_t mVirtualUs = 0;
    int mNextId = 1;
    std::map<int, Listener> mListeners;
    // Snapshot of mListeners for the advancing thread, rebuilt when a listener comes or goes.
    std::shared_ptr<const Listeners> mListenerSnapshot;
    std::map<int, Worker> mWorkers;
    std::set<int64_t> mLookAheads;  // instants (us) a polling worker must look at
};

}  // namespace velmora
