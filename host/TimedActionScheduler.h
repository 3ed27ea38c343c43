// Deadlines of timed actions: an action applied with a positive duration is reverted when its
// deadline passes, unless the same command re-arms it first or withdraws it.
//
// A worker thread waits for the earliest deadline in real time (scaled by the clock's speed);
// in virtual time the clock's advance runs expireDue() on the advancing thread instead, so
// expiry happens exactly at the trace time it falls due. The expiry callback runs without the
// scheduler's lock; it must re-check armed() under its own lock, because the command may have
// been re-armed between expiry and callback. Lock order: caller's lock before mLock.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <thread>

#include "host/HostClock.h"

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
    // Runs the callback for every deadline that has passed.
    void expireDue();

private:
    void run();

    HostClock& mClock;
    ExpiryCallback mOnExpire;
    int mListenerId = 0;
    mutable std::mutex mLock;  // guards mDeadlines and mStop
    std::condition_variable mCond;
    std::map<int, int64_t> mDeadlines;  // cmdId -> trace time in ms
    bool mStop = false;
    std::thread mThread;  // last: started once everything above exists
};

}  // namespace velmora
