#include "host/HostClock.h"

#include <thread>
#include <vector>

namespace velmora {

HostClock::HostClock() : mStart(std::chrono::steady_clock::now()) {}

void HostClock::setRealTime(double speed) {
    std::lock_guard<std::mutex> lock(mLock);
    mVirtual = false;
    mSpeed = speed > 0 ? speed : 1.0;
    mStart = std::chrono::steady_clock::now();
}

void HostClock::setVirtual() {
    std::lock_guard<std::mutex> lock(mLock);
    mVirtual = true;
    mVirtualUs = 0;
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
    mVirtualUs = 0;
}

int64_t HostClock::nowUs() const {
    std::lock_guard<std::mutex> lock(mLock);
    if (mVirtual) {
        return mVirtualUs;
    }
    const auto real = std::chrono::duration_cast<std::chrono::microseconds>(
        std::chrono::steady_clock::now() - mStart);
    return static_cast<int64_t>(static_cast<double>(real.count()) * mSpeed);
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
    if (ms <= 0) {
        return;
    }
    {
        std::lock_guard<std::mutex> lock(mLock);
        if (mVirtual) {
            mVirtualUs += ms * 1000;
        }
    }
    if (isVirtual()) {
        notifyListeners();
    } else {
        std::this_thread::sleep_for(toReal(ms));
    }
}

void HostClock::advanceTo(int64_t ms) {
    sleepMs(ms - nowMs());
}

int HostClock::addListener(std::function<void()> listener) {
    std::lock_guard<std::mutex> lock(mLock);
    const int id = mNextListener++;
    mListeners[id] = std::move(listener);
    return id;
}

void HostClock::removeListener(int id) {
    std::lock_guard<std::mutex> lock(mLock);
    mListeners.erase(id);
}

void HostClock::notifyListeners() {
    std::vector<std::function<void()>> listeners;
    {
        std::lock_guard<std::mutex> lock(mLock);
        for (const auto& entry : mListeners) {
            listeners.push_back(entry.second);
        }
    }
    for (const auto& listener : listeners) {
        listener();
    }
}

}  // namespace velmora
