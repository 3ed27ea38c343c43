// The probe worker's clock in virtual time: time stands still until the test moves it, and
// advance() returns once the worker has made every pass that fell due on the way, so a test
// sees the worker at exact instants without sleeping. One clock per worker; install() makes
// every worker started afterwards take one, last() is the newest.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <mutex>

#include "probe/ProbeClock.h"

namespace velmora {
namespace fake {

class FakeProbeClock : public ProbeClock {
public:
    static void install();
    static void uninstall();
    static FakeProbeClock& last();

    ~FakeProbeClock() override;
    int64_t now() override;
    // Sleeps until the test moves time past the end; 0 (polling) until the next millisecond.
    void sleepMs(int64_t ms) override;
    void wait(android::Condition& cond, android::Mutex& lock) override;
    void signal(android::Condition& cond) override;
    void wakeForExit() override;

    // Moves time on by `ms`, stopping wherever the worker wakes to let it make its pass there.
    void advance(int64_t ms);

private:
    enum class State { Busy, Sleeping, Waiting };
    // Waits until the worker sleeps, waits or has left.
    void settle(std::unique_lock<std::mutex>& lock);

    std::mutex mMutex;  // guards everything below
    std::condition_variable mChanged;
    int64_t mNowNs = 1000000000;  // a probe timestamp of 0 means "withdrawn"
    int64_t mWakeNs = 0;
    State mState = State::Busy;  // the worker starts with a pass
    bool mExiting = false;
};

}  // namespace fake
}  // namespace velmora
