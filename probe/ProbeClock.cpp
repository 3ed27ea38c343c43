#include "probe/ProbeClock.h"

#include <errno.h>
#include <time.h>
#include <utils/Timers.h>

#include <atomic>

namespace velmora {

namespace {

// Set by a platform layer before it builds a server; read whenever a worker starts.
std::atomic<ProbeClock::Factory> gFactory{nullptr};

}  // namespace

ProbeClock::~ProbeClock() = default;

int64_t ProbeClock::now() {
    return systemTime(SYSTEM_TIME_MONOTONIC);
}

void ProbeClock::sleepMs(int64_t ms) {
    // Sleeps the whole time even when a signal interrupts the sleep: waking early would boost a
    // larger thread id that falls due before the smallest one, ahead of the pass meant for both.
    struct timespec left = {static_cast<time_t>(ms / 1000), static_cast<long>(ms % 1000) * 1000000};
    while (nanosleep(&left, &left) != 0 && errno == EINTR) {
    }
}

void ProbeClock::wait(android::Condition& cond, android::Mutex& lock) {
    cond.wait(lock);
}

void ProbeClock::signal(android::Condition& cond) {
    cond.signal();
}

void ProbeClock::wakeForExit() {}

ProbeClock* ProbeClock::create() {
    const Factory factory = gFactory.load();
    ProbeClock* clock = factory != nullptr ? factory() : nullptr;
    return clock != nullptr ? clock : new ProbeClock();
}

void ProbeClock::setFactory(Factory factory) {
    gFactory.store(factory);
}

}  // namespace velmora
