#include "tools/replay/SameCpuScope.h"

namespace velmora {

SameCpuScope::SameCpuScope() {
    CPU_ZERO(&mBefore);
    if (sched_getaffinity(0, sizeof(mBefore), &mBefore) != 0) {
        return;
    }
    const int cpu = sched_getcpu();
    if (cpu < 0 || !CPU_ISSET(cpu, &mBefore)) {
        return;
    }
    cpu_set_t one;
    CPU_ZERO(&one);
    CPU_SET(cpu, &one);
    if (sched_setaffinity(0, sizeof(one), &one) == 0) {
        mCpu = cpu;
    }
}

SameCpuScope::~SameCpuScope() {
    if (mCpu >= 0) {
        sched_setaffinity(0, sizeof(mBefore), &mBefore);
    }
}

}  // namespace velmora
