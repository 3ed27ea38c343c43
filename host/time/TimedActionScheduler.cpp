#include "host/time/TimedActionScheduler.h"

#include <vector>

namespace velmora {

TimedActionScheduler::TimedActionScheduler(HostClock& clock, ExpiryCallback onExpire)
    : mClock(clock), mOnExpire(std::move(onExpire)) {
    mListenerId = mClock.addListener([this] { expireDue(); }, [this] { return nextDeadlineMs(); });
}

TimedActionScheduler::~TimedActionScheduler() {
    mClock.removeListener(mListenerId);
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
    std::lock_guard<std::mutex> lock(mLock);
    eraseLocked(cmdId);
    mDeadlines.emplace(cmdId, deadline);
    mByTime.emplace(deadline, cmdId);
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

}  // namespace velmora
