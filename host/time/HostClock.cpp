#include "host/time/HostClock.h"

#include <algorithm>
#include <thread>

namespace velmora {

HostClock::HostClock()
    : mStart(std::chrono::steady_clock::now()), mListenerSnapshot(std::make_shared<Listeners>()) {}

void HostClock::setRealTime(double speed) {
    std::lock_guard<std::mutex> lock(mLock);
    mVirtual = false;
    mSpeed = speed > 0 ? speed : 1.0;
    mStart = std::chrono::steady_clock::now();
    mHoldUs = kNoDeadline;
}

void HostClock::setVirtual() {
    std::lock_guard<std::mutex> lock(mLock);
    mVirtual = true;
    mVirtualUs = 0;
    mLookAheads.clear();
}

bool HostClock::isVirtual() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mVirtual;
}

double HostClock::speed() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mSpeed;
}

void HostClock::restart() {
    std::lock_guard<std::mutex> lock(mLock);
    mStart = std::chrono::steady_clock::now();
    mHoldUs = kNoDeadline;
    mVirtualUs = 0;
    mLookAheads.clear();
}

int64_t HostClock::realUsLocked() const {
    const auto real = std::chrono::duration_cast<std::chrono::microseconds>(
        std::chrono::steady_clock::now() - mStart);
    return static_cast<int64_t>(static_cast<double>(real.count()) * mSpeed);
}

int64_t HostClock::holdLocked() const {
    int64_t hold = mHoldUs;
    for (const auto& entry : mWorkers) {
        const Worker& worker = entry.second;
        if (worker.exiting) {
            continue;
        }
        if (worker.state == WorkerState::Busy) {
            hold = std::min(hold, worker.busyFromUs);
        } else if (worker.state == WorkerState::Sleeping) {
            hold = std::min(hold, worker.wakeUs);
        } else if (worker.state == WorkerState::Polling && !mLookAheads.empty()) {
            hold = std::min(hold, *mLookAheads.begin());
        }
    }
    return hold;
}

int64_t HostClock::nowUsLocked() const {
    if (mVirtual) {
        return mVirtualUs;
    }
    // Trace time stops at the hold; the start moves on meanwhile, so that once the hold goes
    // time resumes from where it stopped instead of jumping to where real time has got to.
    // Every change of a hold reads the clock first, so no stop goes uncounted.
    const int64_t real = realUsLocked();
    const int64_t hold = holdLocked();
    if (real <= hold) {
        return real;
    }
    mStart +=
        std::chrono::microseconds(static_cast<int64_t>(static_cast<double>(real - hold) / mSpeed));
    return hold;
}

void HostClock::holdAt(int64_t ms) {
    std::lock_guard<std::mutex> lock(mLock);
    nowUsLocked();
    mHoldUs = ms == kNoDeadline ? kNoDeadline : ms * 1000;
    mWorkersChanged.notify_all();
}

int64_t HostClock::nowUs() const {
    std::lock_guard<std::mutex> lock(mLock);
    return nowUsLocked();
}

int64_t HostClock::nowMs() const {
    return nowUs() / 1000;
}

std::chrono::nanoseconds HostClock::toReal(int64_t ms) const {
    std::lock_guard<std::mutex> lock(mLock);
    if (mVirtual || ms <= 0) {
        return std::chrono::nanoseconds(0);
    }
    return std::chrono::nanoseconds(static_cast<int64_t>(static_cast<double>(ms) * 1e6 / mSpeed));
}

void HostClock::sleepMs(int64_t ms) {
    if (ms < 0) {
        ms = 0;
    }
    std::unique_lock<std::mutex> lock(mLock);
    if (mVirtual) {
        const int64_t target = mVirtualUs + ms * 1000;
        lock.unlock();
        advanceVirtual(target);
        return;
    }
    const int64_t target = nowUsLocked() + ms * 1000;
    lock.unlock();
    waitReal(target);
}

void HostClock::advanceTo(int64_t ms) {
    std::unique_lock<std::mutex> lock(mLock);
    if (mVirtual) {
        lock.unlock();
        advanceVirtual(ms * 1000);
        return;
    }
    lock.unlock();
    waitReal(ms * 1000);
}

void HostClock::waitReal(int64_t targetUs) {
    // Like a virtual advance: busy workers finish their pass, and what fell due has run.
    std::unique_lock<std::mutex> lock(mLock);
    for (;;) {
        const int64_t now = nowUsLocked();
        if (anyBusyLocked()) {
            mWorkersChanged.wait_for(lock, kRealPoll);
        } else if (now < targetUs) {
            mWorkersChanged.wait_for(lock, realDurationLocked(targetUs - now));
        } else {
            break;
        }
    }
    lock.unlock();
    runListeners();
}

std::chrono::nanoseconds HostClock::realDurationLocked(int64_t traceUs) const {
    return std::chrono::nanoseconds(
        std::max<int64_t>(1000, static_cast<int64_t>(static_cast<double>(traceUs) * 1e3 / mSpeed)));
}

void HostClock::runListeners() {
    std::shared_ptr<const Listeners> current;
    {
        std::lock_guard<std::mutex> lock(mLock);
        current = mListenerSnapshot;
    }
    for (const auto& listener : *current) {
        listener.onAdvance();
    }
}

int HostClock::addListener(std::function<void()> onAdvance,
                           std::function<int64_t()> nextDeadlineMs) {
    std::lock_guard<std::mutex> lock(mLock);
    const int id = mNextId++;
    mListeners[id] = Listener{std::move(onAdvance), std::move(nextDeadlineMs)};
    auto snapshot = std::make_shared<Listeners>();
    for (const auto& entry : mListeners) {
        snapshot->push_back(entry.second);
    }
    mListenerSnapshot = std::move(snapshot);
    return id;
}

void HostClock::removeListener(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    mListeners.erase(id);
    auto snapshot = std::make_shared<Listeners>();
    for (const auto& entry : mListeners) {
        snapshot->push_back(entry.second);
    }
    mListenerSnapshot = std::move(snapshot);
}

bool HostClock::anyBusyLocked() const {
    for (const auto& entry : mWorkers) {
        if (entry.second.state == WorkerState::Busy && !entry.second.exiting) {
            return true;
        }
    }
    return false;
}

bool HostClock::wakeDueLocked() {
    bool lookAheadReached = false;
    while (!mLookAheads.empty() && *mLookAheads.begin() <= mVirtualUs) {
        mLookAheads.erase(mLookAheads.begin());
        lookAheadReached = true;
    }
    bool woke = false;
    for (auto& entry : mWorkers) {
        Worker& worker = entry.second;
        const bool due = (worker.state == WorkerState::Sleeping && worker.wakeUs <= mVirtualUs) ||
                         (worker.state == WorkerState::Polling && lookAheadReached);
        if (due && !worker.exiting) {
            worker.state = WorkerState::Busy;
            woke = true;
        }
    }
    if (woke) {
        mWorkersChanged.notify_all();
    }
    return woke;
}

void HostClock::advanceVirtual(int64_t targetUs) {
    // Steps from instant to instant: each step waits until no worker is busy, moves to the
    // earliest of the target, a listener's deadline and a worker's wake-up, runs the listeners
    // and wakes the workers due there. A target in the past only settles the current instant.
    for (;;) {
        std::unique_lock<std::mutex> lock(mLock);
        mWorkersChanged.wait(lock, [this] { return !anyBusyLocked(); });
        const std::shared_ptr<const Listeners> current = mListenerSnapshot;
        lock.unlock();
        int64_t listenerUs = kNoDeadline;
        for (const auto& listener : *current) {
            const int64_t ms = listener.nextDeadlineMs();
            if (ms != kNoDeadline) {
                listenerUs = std::min(listenerUs, ms * 1000);
            }
        }
        lock.lock();
        int64_t next = std::min(targetUs, listenerUs);
        bool polling = false;
        for (const auto& entry : mWorkers) {
            if (entry.second.state == WorkerState::Sleeping) {
                next = std::min(next, entry.second.wakeUs);
            }
            polling = polling || entry.second.state == WorkerState::Polling;
        }
        if (polling && !mLookAheads.empty()) {
            next = std::min(next, *mLookAheads.begin());
        }
        mVirtualUs = std::max(mVirtualUs, next);
        const int64_t now = mVirtualUs;
        lock.unlock();
        if (listenerUs <= now) {
            for (const auto& listener : *current) {
                listener.onAdvance();
            }
        }
        lock.lock();
        if (wakeDueLocked()) {
            continue;
        }
        if (mVirtualUs >= targetUs) {
            // Whatever the listeners or woken workers did has settled at the target.
            mWorkersChanged.wait(lock, [this] { return !anyBusyLocked(); });
            return;
        }
    }
}

int HostClock::attachWorker(int64_t lookAheadUs) {
    std::lock_guard<std::mutex> lock(mLock);
    const int id = mNextId++;
    Worker& worker = mWorkers[id];
    worker.lookAheadUs = lookAheadUs;
    worker.busyFromUs = nowUsLocked();
    return id;
}

void HostClock::setStateLocked(Worker& worker, WorkerState state) {
    nowUsLocked();  // counts the stop the old state made
    worker.state = state;
    worker.busyFromUs = mVirtual ? mVirtualUs : realUsLocked();
    mWorkersChanged.notify_all();
}

void HostClock::detachWorker(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    nowUsLocked();
    mWorkers.erase(id);
    mWorkersChanged.notify_all();
}

int64_t HostClock::workerNowUs(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    const int64_t now = nowUsLocked();
    auto it = mWorkers.find(id);
    if (it != mWorkers.end() && it->second.lookAheadUs > 0) {
        mLookAheads.insert(now + it->second.lookAheadUs);
    }
    return now;
}

void HostClock::workerSleep(int id, int64_t ms) {
    std::unique_lock<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it == mWorkers.end() || it->second.exiting) {
        return;
    }
    Worker& worker = it->second;
    const int64_t wake = nowUsLocked() + std::max<int64_t>(ms, 0) * 1000;
    setStateLocked(worker, ms > 0 ? WorkerState::Sleeping : WorkerState::Polling);
    worker.wakeUs = wake;
    if (mVirtual) {
        mWorkersChanged.wait(
            lock, [&worker] { return worker.state == WorkerState::Busy || worker.exiting; });
        return;
    }
    // Real time: the clock holds at `wake` until this thread is back, so the pass after the
    // sleep sees exactly that time however late the thread was scheduled.
    if (ms <= 0) {
        lock.unlock();
        std::this_thread::yield();
        lock.lock();
    } else {
        for (int64_t now = nowUsLocked(); now < wake && !worker.exiting; now = nowUsLocked()) {
            mWorkersChanged.wait_for(lock, realDurationLocked(wake - now));
        }
    }
    if (worker.state != WorkerState::Busy) {
        setStateLocked(worker, WorkerState::Busy);
    }
    while (!mLookAheads.empty() && *mLookAheads.begin() <= worker.busyFromUs) {
        mLookAheads.erase(mLookAheads.begin());
    }
}

void HostClock::workerWait(int id, const std::function<void()>& release,
                           const std::function<void()>& reacquire) {
    std::unique_lock<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it == mWorkers.end() || it->second.exiting) {
        return;
    }
    Worker& worker = it->second;
    setStateLocked(worker, WorkerState::Waiting);
    // Signals come with the caller's mutex held, so none is lost between here and the wait.
    release();
    mWorkersChanged.wait(lock,
                         [&worker] { return worker.state == WorkerState::Busy || worker.exiting; });
    lock.unlock();
    reacquire();
}

void HostClock::workerWaiting(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it != mWorkers.end()) {
        setStateLocked(it->second, WorkerState::Waiting);
    }
}

void HostClock::workerResumed(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it != mWorkers.end() && it->second.state != WorkerState::Busy) {
        setStateLocked(it->second, WorkerState::Busy);
    }
}

void HostClock::workerSignal(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it != mWorkers.end() &&
        (it->second.state == WorkerState::Waiting || it->second.state == WorkerState::Polling)) {
        setStateLocked(it->second, WorkerState::Busy);
    }
}

void HostClock::workerExit(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it != mWorkers.end()) {
        nowUsLocked();
        it->second.exiting = true;
        mWorkersChanged.notify_all();
    }
}

}  // namespace velmora
