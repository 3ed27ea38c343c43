// Deadlines of timed actions: an action applied with a positive duration is reverted when its
// deadline passes, unless the same command re-arms it first or withdraws it.
//
// The scheduler is a listener of the clock: an advance stops at the earliest deadline and runs
// expireDue() on the advancing thread there, so expiry happens exactly at the trace time it
// falls due, paced or not. The expiry callback runs without the scheduler's lock; it must
// re-check armed() under its own lock, because a host thread may have re-armed the command
// between expiry and callback. Lock order: the caller's lock, then mLock, then the clock's.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <set>
#include <utility>

#include "host/time/HostClock.h"

namespace velmora {

class TimedActionScheduler {
public:
    using ExpiryCallback = std::function<void(int cmdId)>;

    TimedActionScheduler(HostClock& clock, ExpiryCallback onExpire);
    // Pending deadlines are dropped without callbacks; no callback runs once this returns.
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
    // REQUIRES: mLock held.
    int64_t earliestLocked() const;
    bool eraseLocked(int cmdId);

    HostClock& mClock;
    ExpiryCallback mOnExpire;
    int mListenerId = 0;
    mutable std::mutex mLock;                   // guards everything below
    std::map<int, int64_t> mDeadlines;          // cmdId -> trace time in ms
    std::set<std::pair<int64_t, int>> mByTime;  // (trace time, cmdId), earliest first
};

}  // namespace velmora
