// The probe worker's time: its "now", its whole-millisecond sleep and its wait for work.
//
// On a device every call is the system's own: systemTime(SYSTEM_TIME_MONOTONIC), a sleep that
// runs its whole length even when a signal interrupts it, and a wait on the worker's condition
// (created on CLOCK_MONOTONIC). A platform layer that runs the library off the device (a host
// replaying a trace in virtual time) installs a factory, and every worker started after that
// reads time and waits through a clock of its own making instead.
//
// Each ProbeThread creates its clock in its constructor, on the thread that builds the handler,
// and deletes it in its destructor. now() is called by host threads and by the worker; sleepMs,
// wait and wakeForExit by the worker's owner as documented below. signal() and wait() are
// called with the worker's mutex held.
#pragma once

#include <stdint.h>
#include <utils/Condition.h>
#include <utils/Mutex.h>

#include "platform/VelmoraExport.h"

namespace velmora {

// Exported: a platform layer that runs the library off the device (host/) derives its clock
// from it and installs a factory.
class VELMORA_EXPORT ProbeClock {
public:
    using Factory = ProbeClock* (*)();

    virtual ~ProbeClock();

    // Monotonic time in nanoseconds; never 0 (0 marks a withdrawn probe item).
    virtual int64_t now();
    // Sleeps `ms` whole milliseconds, the whole time; 0 just gives up the processor.
    virtual void sleepMs(int64_t ms);
    // Waits on `cond` without a time limit; `lock` is held on entry and on return.
    virtual void wait(android::Condition& cond, android::Mutex& lock);
    // Wakes the worker waiting on `cond`, if it waits; a sleep runs on.
    virtual void signal(android::Condition& cond);
    // The worker has been asked to exit: a clock that could keep it sleeping for good lets it
    // go now. The system's sleep ends on its own within the boost delay, so this does nothing.
    virtual void wakeForExit();

    // A clock for a new worker: the installed factory's, else the system's. Owned by the caller.
    static ProbeClock* create();
    // Installs `factory` for workers started from now on; null goes back to the system's.
    static void setFactory(Factory factory);
};

}  // namespace velmora
