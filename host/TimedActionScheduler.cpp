#include "host/TimedActionScheduler.h"

#include <vector>

namespace velmora {

TimedActionScheduler::TimedActionScheduler(HostClock& clock, ExpiryCallback onExpire)
    : mClock(clock), mOnExpire(std::move(onExpire)) {
    mListenerId = mClock.addListener([this] { expireDue(); });
    mThread = std::thread([this] { run(); });
}

TimedActionScheduler::~TimedActionScheduler() {
    mClock.removeListener(mListenerId);
    {
        std::lock_guard<std::mutex> lock(mLock);
        mStop = true;
        mDeadlines.clear();
    }
    mCond.notify_all();
    mThread.join();
}

void TimedActionScheduler::arm(int cmdId, int64_t durationMs) {
    {
        std::lock_guard<std::mutex> lock(mLock);
        mDeadlines[cmdId] = mClock.nowMs() + durationMs;
    }
    mCond.notify_all();
}

bool TimedActionScheduler::cancel(int cmdId) {
    std::lock_guard<std::mutex> lock(mLock);
    return mDeadlines.erase(cmdId) != 0;
}

bool TimedActionScheduler::armed(int cmdId) const {
    std::lock_guard<std::mutex> lock(mLock);
    return mDeadlines.count(cmdId) != 0;
}

size_t TimedActionScheduler::pending() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mDeadlines.size();
}

void TimedActionScheduler::expireDue() {
    std::vector<int> due;
    {
        std::lock_guard<std::mutex> lock(mLock);
        const int64_t now = mClock.nowMs();
        for (auto it = mDeadlines.begin(); it != mDeadlines.end();) {
            if (it->second <= now) {
                due.push_back(it->first);
                it = mDeadlines.erase(it);
            } else {
                ++it;
            }
        }
    }
    for (int cmdId : due) {
        mOnExpire(cmdId);
    }
}

void TimedActionScheduler::run() {
    std::unique_lock<std::mutex> lock(mLock);
    while (!mStop) {
        if (mDeadlines.empty() || mClock.isVirtual()) {
            // Virtual time moves only through the clock, whose listener expires deadlines.
            mCond.wait(lock);
            continue;
        }
        int64_t earliest = mDeadlines.begin()->second;
        for (const auto& entry : mDeadlines) {
            earliest = std::min(earliest, entry.second);
        }
        const int64_t remaining = earliest - mClock.nowMs();
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
