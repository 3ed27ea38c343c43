// Keeps the calling thread, and every thread it starts meanwhile, on the processor it is running
// on, until the scope ends (the thread's own affinity is then restored; threads started meanwhile
// keep theirs).
//
// A --fast replay hands over to the library's probe worker and back thousands of times a
// second, each time waiting for the other thread's pass. On one processor such a hand-over is a
// direct switch between the two threads; across processors it is a wake-up of an idle core,
// whose cost depends on how deep that core sleeps, i.e. on how busy the machine is. The replay
// builds its server (and with it the worker) inside this scope.
#pragma once

#include <sched.h>

namespace velmora {

class SameCpuScope {
public:
    SameCpuScope();
    ~SameCpuScope();
    SameCpuScope(const SameCpuScope&) = delete;
    SameCpuScope& operator=(const SameCpuScope&) = delete;

    // The processor kept to, or -1 when the affinity could not be changed (nothing else
    // changes then).
    int cpu() const { return mCpu; }

private:
    cpu_set_t mBefore;
    int mCpu = -1;
};

}  // namespace velmora
