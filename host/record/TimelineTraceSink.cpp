#include "host/record/TimelineTraceSink.h"

#include <pthread.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <mutex>
#include <string>
#include <vector>

namespace velmora {

namespace {

struct OpenSlice {
    std::string name;
    int64_t beginUs;
};

// Slices the calling thread has begun and not ended yet: the first tOpenDepth, innermost last.
// Entries past the depth are kept for their names' buffers.
thread_local std::vector<OpenSlice> tOpenSlices;
thread_local size_t tOpenDepth = 0;

// The calling thread's id, asked of the kernel once per thread (and again in a forked child).
thread_local int tTid = 0;

void forgetTidInChild() {
    tTid = 0;
}

int currentTid() {
    if (tTid == 0) {
        static std::once_flag registered;
        std::call_once(registered, [] { pthread_atfork(nullptr, nullptr, forgetTidInChild); });
        tTid = static_cast<int>(syscall(SYS_gettid));
    }
    return tTid;
}

}  // namespace

TimelineTraceSink::TimelineTraceSink(HostClock& clock, Timeline& timeline)
    : mClock(clock), mTimeline(timeline) {}

void TimelineTraceSink::counter(const char* track, int64_t value) {
    mTimeline.recordCounter(track, value);
}

void TimelineTraceSink::beginSlice(const char* name) {
    const int64_t now = mClock.nowUs();
    if (tOpenDepth == tOpenSlices.size()) {
        tOpenSlices.push_back({name, now});
    } else {
        tOpenSlices[tOpenDepth].name.assign(name);
        tOpenSlices[tOpenDepth].beginUs = now;
    }
    ++tOpenDepth;
}

void TimelineTraceSink::endSlice() {
    if (tOpenDepth == 0) {
        return;  // begun before this sink was installed
    }
    const OpenSlice& slice = tOpenSlices[--tOpenDepth];
    mTimeline.recordSlice(slice.name, slice.beginUs, mClock.nowUs(), currentTid());
}

}  // namespace velmora
