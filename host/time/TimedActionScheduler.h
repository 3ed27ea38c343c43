// Deadlines of timed actions: an action applied with a positive duration is reverted when its
// deadline passes, unless the same command re-arms it first or withdraws it.
//
// A worker thread waits for the earliest deadline in real time (scaled by the clock's speed) and
// is woken only when the earliest deadline changes. In virtual time the clock asks for the
// earliest deadline and runs expireDue() on the advancing thread when it gets there, so expiry
// happens exactly at the trace time it falls due. The expiry callback runs without the
// scheduler's lock; it must re-check armed() under its own lock, because the command may have
// been re-armed between expiry and callback. Lock order: mExpiryLock, then the caller's lock,
// then mLock, then the clock's lock.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <set>
#include <thread>
#include <utility>

#include "host/time/HostClock.h"

namespace velmora {

class TimedActionScheduler {
public:
    using ExpiryCallback = std::function<void(int cmdId)>;

    TimedActionScheduler(HostClock& clock, ExpiryCallback onExpire);
    // Stops the worker; pending deadlines are dropped without callbacks.
    ~TimedActionScheduler();

    // (Re-)arms `cmdId` to expire `durationMs` of clock time from now.
    void arm(int cmdId, int64_t durationMs);
    // Cancels the deadline of `cmdId`. True when one was pending.
    bool cancel(int cmdId);
    bool armed(int cmdId) const;
    size_t pending() const;
    // The earliest pending deadline in trace ms, or HostClock::kNoDeadline.
    int64_t nextDeadlineMs() const;
    // Runs the callback for every deadline that has passed.
    void expireDue();

private:
    void run();
    // REQUIRES: mLock held.
    int64_t earliestLocked() const;
    bool eraseLocked(int cmdId);

    HostClock& mClock;
    ExpiryCallback mOnExpire;
    int mListenerId = 0;
    // Held for a whole expireDue, callbacks included; taken before the callbacks' locks.
    std::mutex mExpiryLock;
    mutable std::mutex mLock;                   // guards everything below
    std::condition_variable mCond;              // the earliest deadline changed, or stop
    std::map<int, int64_t> mDeadlines;          // cmdId -> trace time in ms
    std::set<std::pair<int64_t, int>> mByTime;  // (trace time, cmdId), earliest first
    bool mStop = false;
    std::thread mThread;  // last: started once everything above exists
};

}  // namespace velmora
