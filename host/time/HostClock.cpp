#include "host/time/HostClock.h"

#include <sched.h>

#include <algorithm>
#include <thread>
#include <vector>

namespace velmora {

namespace {

// A worker's pass takes microseconds: an advance that finds one busy first gives up the
// processor this many times (the worker usually finishes meanwhile) before it blocks.
constexpr int kSettleYields = 50;
// Longest single wall-clock wait of a paced advance, so that an interrupt is seen promptly.
constexpr std::chrono::milliseconds kPaceSlice{50};

}  // namespace

HostClock::HostClock() : mStart(std::chrono::steady_clock::now()) {}

void HostClock::setVirtual() {
    std::lock_guard<std::mutex> lock(mLock);
    mPaced = false;
    mSpeed = 1.0;
    mNowUs = 0;
    mLookAheads.clear();
    mInterrupted = false;
}

void HostClock::setPaced(double speed) {
    std::lock_guard<std::mutex> lock(mLock);
    mPaced = true;
    mSpeed = speed > 0 ? speed : 1.0;
    mStart = std::chrono::steady_clock::now();
    mNowUs = 0;
    mLookAheads.clear();
    mInterrupted = false;
}

bool HostClock::paced() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mPaced;
}

double HostClock::speed() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mSpeed;
}

void HostClock::restart() {
    std::lock_guard<std::mutex> lock(mLock);
    mStart = std::chrono::steady_clock::now();
    mNowUs = 0;
    mLookAheads.clear();
    mInterrupted = false;
}

void HostClock::alignWall() {
    std::lock_guard<std::mutex> lock(mLock);
    mStart = std::chrono::steady_clock::now() -
             std::chrono::duration_cast<std::chrono::steady_clock::duration>(
                 std::chrono::duration<double, std::micro>(static_cast<double>(mNowUs) / mSpeed));
}

int64_t HostClock::nowUs() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mNowUs;
}

int64_t HostClock::nowMs() const {
    return nowUs() / 1000;
}

int64_t HostClock::wallUs() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mPaced ? wallUsLocked() : mNowUs;
}

int64_t HostClock::wallUsLocked() const {
    const auto real = std::chrono::duration_cast<std::chrono::microseconds>(
        std::chrono::steady_clock::now() - mStart);
    return static_cast<int64_t>(static_cast<double>(real.count()) * mSpeed);
}

std::chrono::steady_clock::time_point HostClock::wallOf(int64_t us) const {
    return mStart +
           std::chrono::duration_cast<std::chrono::steady_clock::duration>(
               std::chrono::duration<double, std::micro>(static_cast<double>(us) / mSpeed));
}

void HostClock::interrupt() {
    mInterrupted.store(true);
}

bool HostClock::interrupted() const {
    return mInterrupted.load();
}

void HostClock::sleepMs(int64_t ms) {
    const int64_t from = nowUs();
    advanceUs(from + std::max<int64_t>(ms, 0) * 1000);
}

void HostClock::advanceTo(int64_t ms) {
    advanceUs(ms * 1000);
}

void HostClock::advanceUs(int64_t targetUs) {
    std::lock_guard<std::mutex> advancing(mAdvanceLock);
    std::unique_lock<std::mutex> lock(mLock);
    for (;;) {
        settle(lock);
        // Listeners take their own locks, which come before mLock.
        lock.unlock();
        const int64_t listenerUs = listenerDeadlineUs();
        lock.lock();
        if (mBusy.load() != 0) {
            continue;  // signalled meanwhile: that pass belongs to this instant
        }
        if (listenerUs <= mNowUs) {
            lock.unlock();
            runListeners();
            lock.lock();
            continue;
        }
        if (wakeDueLocked()) {
            continue;
        }
        if (mNowUs >= targetUs) {
            return;
        }
        if (mPaced && mInterrupted.load()) {
            // Stop where the wall clock has got to, and stop pacing for good.
            targetUs = std::min(targetUs, std::max(mNowUs, wallUsLocked()));
            mPaced = false;
            continue;
        }
        const int64_t next = std::min({targetUs, listenerUs, workerDueUsLocked()});
        if (mPaced) {
            const auto wall = wallOf(next);
            const auto now = std::chrono::steady_clock::now();
            if (now < wall) {
                lock.unlock();
                std::this_thread::sleep_for(
                    std::min<std::chrono::steady_clock::duration>(wall - now, kPaceSlice));
                lock.lock();
                continue;  // someone may have armed or signalled something meanwhile
            }
        }
        mNowUs = next;
    }
}

void HostClock::settle(std::unique_lock<std::mutex>& lock) {
    if (mBusy.load() == 0) {
        return;
    }
    std::vector<std::shared_ptr<Worker>> toWake;
    for (auto& entry : mWorkers) {
        if (entry.second->wakePending) {
            entry.second->wakePending = false;
            toWake.push_back(entry.second);
        }
    }
    lock.unlock();
    for (const auto& worker : toWake) {
        worker->wake.notify_one();
    }
    for (int i = 0; i < kSettleYields && mBusy.load() != 0; ++i) {
        sched_yield();
    }
    lock.lock();
    mSettled.wait(lock, [this] { return mBusy.load() == 0; });
}

int64_t HostClock::listenerDeadlineUs() const {
    int64_t earliest = kNoDeadline;
    for (const auto& entry : mListeners) {
        const int64_t ms = entry.second.nextDeadlineMs();
        if (ms != kNoDeadline) {
            earliest = std::min(earliest, ms * 1000);
        }
    }
    return earliest;
}

void HostClock::runListeners() {
    for (const auto& entry : mListeners) {
        entry.second.onAdvance();
    }
}

int HostClock::addListener(std::function<void()> onAdvance,
                           std::function<int64_t()> nextDeadlineMs) {
    std::lock_guard<std::mutex> advancing(mAdvanceLock);
    int id;
    {
        std::lock_guard<std::mutex> lock(mLock);
        id = mNextId++;
    }
    mListeners[id] = Listener{std::move(onAdvance), std::move(nextDeadlineMs)};
    return id;
}

void HostClock::removeListener(int id) {
    std::lock_guard<std::mutex> advancing(mAdvanceLock);
    mListeners.erase(id);
}

int64_t HostClock::workerDueUsLocked() const {
    int64_t due = kNoDeadline;
    bool polling = false;
    for (const auto& entry : mWorkers) {
        const Worker& worker = *entry.second;
        if (worker.exiting) {
            continue;
        }
        if (worker.state == WorkerState::Sleeping) {
            due = std::min(due, worker.wakeUs);
        }
        polling = polling || worker.state == WorkerState::Polling;
    }
    if (polling && !mLookAheads.empty()) {
        due = std::min(due, *mLookAheads.begin());
    }
    return due;
}

bool HostClock::wakeDueLocked() {
    bool lookAheadReached = false;
    while (!mLookAheads.empty() && *mLookAheads.begin() <= mNowUs) {
        mLookAheads.erase(mLookAheads.begin());
        lookAheadReached = true;
    }
    bool woke = false;
    for (auto& entry : mWorkers) {
        Worker& worker = *entry.second;
        const bool due = (worker.state == WorkerState::Sleeping && worker.wakeUs <= mNowUs) ||
                         (worker.state == WorkerState::Polling && lookAheadReached);
        if (due && !worker.exiting) {
            setStateLocked(worker, WorkerState::Busy);
            woke = true;
        }
    }
    return woke;
}

void HostClock::setStateLocked(Worker& worker, WorkerState state) {
    const bool wasBusy = countsAsBusy(worker);
    worker.state = state;
    const bool isBusy = countsAsBusy(worker);
    if (isBusy && !wasBusy) {
        ++mBusy;
        worker.freshPass = true;
        worker.wakePending = true;
    } else if (wasBusy && !isBusy && --mBusy == 0) {
        mSettled.notify_all();
    }
}

void HostClock::markExitingLocked(Worker& worker) {
    const bool wasBusy = countsAsBusy(worker);
    worker.exiting = true;
    worker.wake.notify_one();
    if (wasBusy && --mBusy == 0) {
        mSettled.notify_all();
    }
}

int HostClock::attachWorker(int64_t lookAheadUs) {
    std::lock_guard<std::mutex> lock(mLock);
    const int id = mNextId++;
    auto worker = std::make_shared<Worker>();
    worker->lookAheadUs = lookAheadUs;
    mWorkers[id] = std::move(worker);
    ++mBusy;  // about to make its first pass
    return id;
}

void HostClock::detachWorker(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it == mWorkers.end()) {
        return;
    }
    markExitingLocked(*it->second);
    mWorkers.erase(it);
}

int64_t HostClock::workerNowUs(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it == mWorkers.end()) {
        return mNowUs;
    }
    Worker& worker = *it->second;
    if (worker.freshPass && worker.thread == std::this_thread::get_id()) {
        worker.freshPass = false;
    } else if (worker.lookAheadUs > 0) {
        mLookAheads.insert(mNowUs + worker.lookAheadUs);
    }
    return mNowUs;
}

HostClock::Worker* HostClock::callingWorkerLocked(int id) {
    auto it = mWorkers.find(id);
    if (it == mWorkers.end() || it->second->exiting) {
        return nullptr;
    }
    it->second->thread = std::this_thread::get_id();
    return it->second.get();
}

void HostClock::workerSleep(int id, int64_t ms) {
    std::unique_lock<std::mutex> lock(mLock);
    Worker* const found = callingWorkerLocked(id);
    if (found == nullptr) {
        return;
    }
    Worker& worker = *found;
    if (ms <= 0 && worker.again) {
        worker.again = false;
        worker.freshPass = true;
        return;
    }
    worker.again = false;
    worker.wakeUs = mNowUs + std::max<int64_t>(ms, 0) * 1000;
    setStateLocked(worker, ms > 0 ? WorkerState::Sleeping : WorkerState::Polling);
    worker.wake.wait(lock,
                     [&worker] { return worker.state == WorkerState::Busy || worker.exiting; });
}

void HostClock::workerWait(int id, const std::function<void()>& release,
                           const std::function<void()>& reacquire) {
    std::unique_lock<std::mutex> lock(mLock);
    Worker* const found = callingWorkerLocked(id);
    if (found == nullptr) {
        return;
    }
    Worker& worker = *found;
    worker.again = false;
    setStateLocked(worker, WorkerState::Waiting);
    // Signals come with the caller's mutex held, so none is lost between here and the wait.
    release();
    worker.wake.wait(lock,
                     [&worker] { return worker.state == WorkerState::Busy || worker.exiting; });
    lock.unlock();
    reacquire();
}

void HostClock::workerSignal(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it == mWorkers.end()) {
        return;
    }
    Worker& worker = *it->second;
    if (worker.state == WorkerState::Waiting || worker.state == WorkerState::Polling) {
        setStateLocked(worker, WorkerState::Busy);
    } else if (worker.state == WorkerState::Busy) {
        worker.again = true;
    }
}

void HostClock::workerExit(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mWorkers.find(id);
    if (it != mWorkers.end()) {
        markExitingLocked(*it->second);
    }
}

}  // namespace velmora
