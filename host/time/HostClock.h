// The one clock of the host platform layer: trace time since the last restart, in microseconds.
//
// Time is always virtual: it moves only when a thread advances it (advanceTo, sleepMs), from
// instant to instant. A replay at real speed is the same virtual time *paced* by the wall
// clock: before the clock moves to the next instant it waits until the wall clock, scaled by
// the speed, has got there. Nothing else differs between a paced and an unpaced (--fast) run,
// so both give the same results, and a machine too busy to keep up makes a paced replay late
// rather than different.
//
// An advance moves to the earliest of: its target, a listener's deadline (the timed-action
// scheduler), a sleeping worker's wake-up, and, for a worker that polls, the next instant it
// asked to look at. Before each step it lets every worker finish the pass it is making: time
// never moves while a worker is busy. At each instant it runs the listeners that are due, then
// wakes the workers that are due, and steps again once they have settled.
//
// Workers are threads that sleep and wait on this clock (the library's probe worker, through
// HostProbeClock). Their sleeps and waits never touch the wall clock: they end when an advance
// reaches their instant, or when a host thread signals them.
//
// Thread safe. Advances are serialised (mAdvanceLock); listeners run on the advancing thread
// with mAdvanceLock held and mLock released. Lock order: mAdvanceLock, then a listener's own
// locks, then the probe worker's mutex, then mLock.
#pragma once

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <thread>

namespace velmora {

class HostClock {
public:
    static constexpr int64_t kNoDeadline = INT64_MAX;

    HostClock();

    // Unpaced: advances move at once (velmora-replay --fast). Restarts at 0.
    void setVirtual();
    // Paced at `speed` trace milliseconds per wall-clock millisecond (speed > 0; anything else
    // is 1). Restarts at 0.
    void setPaced(double speed);
    bool paced() const;
    double speed() const;
    // Time back to 0 (and the wall clock's start to now), the mode kept, an interrupt cleared.
    void restart();
    // Paced: from now on the wall clock counts from the current trace time, as if pacing began
    // here (set-up that took wall time does not make the first instants late).
    void alignWall();

    int64_t nowMs() const;
    int64_t nowUs() const;
    // Paced: how far the wall clock has got, in trace microseconds since the restart. Unpaced:
    // nowUs().
    int64_t wallUs() const;

    // Advances by `ms` (negative counts as 0).
    void sleepMs(int64_t ms);
    // Advances to trace time `ms`. A time that has passed does not move the clock, but still
    // settles the current instant: busy workers finish their pass and what is due has run.
    void advanceTo(int64_t ms);

    // Stops pacing at once, also in the middle of a wait: an advance under way stops at the
    // time the wall clock has reached, and later ones do not wait for the wall clock. Only sets
    // an atomic flag, so a signal handler may call it.
    void interrupt();
    bool interrupted() const;

    // `onAdvance` runs on the advancing thread at every instant at or after the deadline that
    // `nextDeadlineMs` tells (kNoDeadline for none). Returns an id for removeListener.
    int addListener(std::function<void()> onAdvance, std::function<int64_t()> nextDeadlineMs);
    // Once it returns, the listener is not running and will not run again.
    void removeListener(int id);

    // Worker side. attachWorker registers a worker that is about to make its first pass (busy);
    // `lookAheadUs` is how long after a time read through workerNowUs it may have business
    // (every read but the one the worker starts a pass with may stamp an item).
    int attachWorker(int64_t lookAheadUs);
    void detachWorker(int id);
    int64_t workerNowUs(int id);
    // Sleeps until `ms` from now; 0 polls: the worker is woken at the next instant it looked
    // ahead to, or when signalled.
    void workerSleep(int id, int64_t ms);
    // Waits until signalled. `release` runs once the worker is known to be waiting, `reacquire`
    // before returning (the caller's own mutex, which signallers hold).
    void workerWait(int id, const std::function<void()>& release,
                    const std::function<void()>& reacquire);
    // Work arrived: a waiting or polling worker makes a pass before time moves on. A sleeping
    // worker sleeps on, as a thread in a sleep does.
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
        int64_t wakeUs = 0;  // Sleeping: when it wakes
        int64_t lookAheadUs = 0;
        bool exiting = false;
        // The worker's own thread, known from its first sleep or wait.
        std::thread::id thread;
        // Busy since its last wake-up and not read the time yet: that read starts a pass and
        // stamps nothing, so it needs no look-ahead.
        bool freshPass = false;
        // Signalled while busy: the signal found the worker mid-pass, so a worker that polls
        // makes one more pass at once, as a polling thread would.
        bool again = false;
        // Made busy but not woken yet: the advancing thread wakes it when it settles, holding
        // no lock, so that neither a signaller nor the advance is preempted by a worker that
        // would only block on their locks.
        bool wakePending = false;
        std::condition_variable wake;  // state left Sleeping/Polling/Waiting, or exiting
    };

    void advanceUs(int64_t targetUs);
    // Waits until no worker is busy; `lock` holds mLock.
    void settle(std::unique_lock<std::mutex>& lock);
    // Earliest listener deadline in us; called with mAdvanceLock held and mLock not held.
    int64_t listenerDeadlineUs() const;
    void runListeners();
    // Earliest instant a sleeping or polling worker has to be woken at.
    int64_t workerDueUsLocked() const;
    // Wakes the workers due at the current time; true when one was woken.
    bool wakeDueLocked();
    void setStateLocked(Worker& worker, WorkerState state);
    // The worker `id` calling from its own thread (remembered), or null when it is leaving.
    Worker* callingWorkerLocked(int id);
    void markExitingLocked(Worker& worker);
    static bool countsAsBusy(const Worker& worker) {
        return worker.state == WorkerState::Busy && !worker.exiting;
    }
    // Paced: how far the wall clock has got, in trace microseconds.
    int64_t wallUsLocked() const;
    // Paced: the wall-clock instant of trace time `us`.
    std::chrono::steady_clock::time_point wallOf(int64_t us) const;

    // Serialises advances; held while listeners run and while the listener table changes.
    std::mutex mAdvanceLock;
    std::map<int, Listener> mListeners;  // guarded by mAdvanceLock

    mutable std::mutex mLock;          // guards everything below
    std::condition_variable mSettled;  // the last busy worker finished its pass
    bool mPaced = false;
    double mSpeed = 1.0;
    std::chrono::steady_clock::time_point mStart;
    int64_t mNowUs = 0;
    int mNextId = 1;
    std::map<int, std::shared_ptr<Worker>> mWorkers;
    std::set<int64_t> mLookAheads;  // instants (us) a polling worker must look at
    // Busy workers, also read without mLock by an advance that spins briefly before it blocks.
    std::atomic<int> mBusy{0};
    std::atomic<bool> mInterrupted{false};
};

}  // namespace velmora
