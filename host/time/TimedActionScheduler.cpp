#include "host/time/TimedActionScheduler.h"

#include <vector>

namespace velmora {

TimedActionScheduler::TimedActionScheduler(HostClock& clock, ExpiryCallback onExpire)
    : mClock(clock), mOnExpire(std::move(onExpire)) {
    mListenerId = mClock.addListener([this] { expireDue(); }, [this] { return nextDeadlineMs(); });
    mThread = std::thread([this] { run(); });
}

TimedActionScheduler::~TimedActionScheduler() {
    mClock.removeListener(mListenerId);
    {
        std::lock_guard<std::mutex> lock(mLock);
        mStop = true;
        mDeadlines.clear();
        mByTime.clear();
    }
    mCond.notify_all();
    mThread.join();
}

int64_t TimedActionScheduler::earliestLocked() const {
    return mByTime.empty() ? HostClock::kNoDeadline : mByTime.begin()->first;
}

bool TimedActionScheduler::eraseLocked(int cmdId) {
    auto it = mDeadlines.find(cmdId);
    if (it == mDeadlines.end()) {
        return false;
    }
    mByTime.erase({it->second, cmdId});
    mDeadlines.erase(it);
    return true;
}

void TimedActionScheduler::arm(int cmdId, int64_t durationMs) {
    const int64_t deadline = mClock.nowMs() + durationMs;
    // In virtual time the worker has nothing to do: the clock expires deadlines itself.
    const bool wake = !mClock.isVirtual();
    bool earlier;
    {
        std::lock_guard<std::mutex> lock(mLock);
        const int64_t before = earliestLocked();
        eraseLocked(cmdId);
        mDeadlines.emplace(cmdId, deadline);
        mByTime.emplace(deadline, cmdId);
        earlier = earliestLocked() < before;
    }
    // A later earliest deadline (this command re-armed) only makes the worker wake once for
    // nothing; it goes back to sleep until the new one.
    if (earlier && wake) {
        mCond.notify_one();
    }
}

bool TimedActionScheduler::cancel(int cmdId) {
    std::lock_guard<std::mutex> lock(mLock);
    return eraseLocked(cmdId);
}

bool TimedActionScheduler::armed(int cmdId) const {
    std::lock_guard<std::mutex> lock(mLock);
    return mDeadlines.count(cmdId) != 0;
}

size_t TimedActionScheduler::pending() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mDeadlines.size();
}

int64_t TimedActionScheduler::nextDeadlineMs() const {
    std::lock_guard<std::mutex> lock(mLock);
    return earliestLocked();
}

void TimedActionScheduler::expireDue() {
    // Whoever comes second (the worker or a thread advancing the clock) waits until the first
    // has run its callbacks: what fell due is done when this returns.
    std::lock_guard<std::mutex> expiring(mExpiryLock);
    std::vector<int> due;
    const int64_t now = mClock.nowMs();
    {
        std::lock_guard<std::mutex> lock(mLock);
        while (!mByTime.empty() && mByTime.begin()->first <= now) {
            const int cmdId = mByTime.begin()->second;
            due.push_back(cmdId);
            mByTime.erase(mByTime.begin());
            mDeadlines.erase(cmdId);
        }
    }
    for (int cmdId : due) {
        mOnExpire(cmdId);
    }
}

void TimedActionScheduler::run() {
    std::unique_lock<std::mutex> lock(mLock);
    while (!mStop) {
        if (mByTime.empty() || mClock.isVirtual()) {
            // Virtual time moves only through the clock, which expires deadlines itself.
            mCond.wait(lock);
            continue;
        }
        const int64_t remaining = earliestLocked() - mClock.nowMs();
        if (remaining > 0) {
            mCond.wait_for(lock, mClock.toReal(remaining));
            continue;
        }
        lock.unlock();
        expireDue();
        lock.lock();
    }
}

}  // namespace velmora
