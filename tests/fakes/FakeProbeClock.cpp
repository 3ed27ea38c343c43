#include "tests/fakes/FakeProbeClock.h"

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>

namespace velmora {
namespace fake {

namespace {

constexpr int64_t kNsPerMs = 1000000;
std::atomic<FakeProbeClock*> gLast{nullptr};

ProbeClock* makeClock() {
    auto* clock = new FakeProbeClock();
    gLast.store(clock);
    return clock;
}

}  // namespace

void FakeProbeClock::install() {
    ProbeClock::setFactory(&makeClock);
}

void FakeProbeClock::uninstall() {
    ProbeClock::setFactory(nullptr);
}

FakeProbeClock& FakeProbeClock::last() {
    return *gLast.load();
}

FakeProbeClock::~FakeProbeClock() {
    FakeProbeClock* self = this;
    gLast.compare_exchange_strong(self, nullptr);
}

int64_t FakeProbeClock::now() {
    std::lock_guard<std::mutex> lock(mMutex);
    return mNowNs;
}

void FakeProbeClock::sleepMs(int64_t ms) {
    std::unique_lock<std::mutex> lock(mMutex);
    mWakeNs = mNowNs + (ms > 0 ? ms : 1) * kNsPerMs;
    mState = State::Sleeping;
    mChanged.notify_all();
    mChanged.wait(lock, [this] { return mState == State::Busy || mExiting; });
    mState = State::Busy;
}

void FakeProbeClock::wait(android::Condition& cond, android::Mutex& lock) {
    {
        std::lock_guard<std::mutex> guard(mMutex);
        mState = State::Waiting;
        mChanged.notify_all();
    }
    cond.wait(lock);
    std::lock_guard<std::mutex> guard(mMutex);
    mState = State::Busy;
}

void FakeProbeClock::signal(android::Condition& cond) {
    {
        std::lock_guard<std::mutex> guard(mMutex);
        if (mState == State::Waiting) {
            mState = State::Busy;  // a sleep runs on
        }
    }
    cond.signal();
}

void FakeProbeClock::wakeForExit() {
    std::lock_guard<std::mutex> guard(mMutex);
    mExiting = true;
    mChanged.notify_all();
}

void FakeProbeClock::advance(int64_t ms) {
    std::unique_lock<std::mutex> lock(mMutex);
    const int64_t target = mNowNs + ms * kNsPerMs;
    for (settle(lock); mState == State::Sleeping && mWakeNs <= target && !mExiting; settle(lock)) {
        mNowNs = mWakeNs;
        mState = State::Busy;
        mChanged.notify_all();
    }
    mNowNs = target;
}

void FakeProbeClock::settle(std::unique_lock<std::mutex>& lock) {
    // Only a worker that never gets going (a broken test) waits this long.
    if (!mChanged.wait_for(lock, std::chrono::seconds(30),
                           [this] { return mState != State::Busy || mExiting; })) {
        std::fprintf(stderr, "FakeProbeClock: the worker never finished its pass\n");
        std::abort();
    }
}

}  // namespace fake
}  // namespace velmora
