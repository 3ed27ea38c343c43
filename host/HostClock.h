// The clock of the host platform layer: trace time in milliseconds since the last restart.
//
// Real-time mode follows the steady clock, optionally sped up (speed 10 runs ten trace
// milliseconds per real millisecond). Virtual mode never waits: sleepMs and advanceTo move the
// time forward at once and then run the listeners (the timed-action scheduler expires what fell
// due), so a replay in virtual mode is deterministic. Thread safe; listeners run on the thread
// that advanced the time, without the clock's lock held.
#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>

namespace velmora {

class HostClock {
public:
    HostClock();

    // Real time at `speed` trace milliseconds per real millisecond (speed > 0). Restarts at 0.
    void setRealTime(double speed);
    // Virtual time, starting at 0.
    void setVirtual();
    bool isVirtual() const;
    double speed() const;
    // Sets the time back to 0 without changing the mode.
    void restart();

    int64_t nowMs() const;
    int64_t nowUs() const;
    // Waits `ms` of trace time (real mode) or advances by it (virtual mode).
    void sleepMs(int64_t ms);
    // Waits or advances until trace time `ms`; nothing when that time has passed.
    void advanceTo(int64_t ms);
    // Real duration of `ms` trace milliseconds (zero in virtual mode).
    std::chrono::nanoseconds toReal(int64_t ms) const;

    // Listeners run after every virtual advance. Returns an id for removeListener.
    int addListener(std::function<void()> listener);
    void removeListener(int id);

private:
    void notifyListeners();

    mutable std::mutex mLock;  // guards everything below; never held while listeners run
    bool mVirtual = false;
    double mSpeed = 1.0;
    std::chrono::steady_clock::time_point mStart;
    int64_t mVirtualUs = 0;
    int mNextListener = 1;
    std::map<int, std::function<void()>> mListeners;
};

}  // namespace velmora
