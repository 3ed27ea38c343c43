#include "host/record/TimelineTraceSink.h"

#include <sys/syscall.h>
#include <unistd.h>

#include <string>
#include <vector>

namespace velmora {

namespace {

struct OpenSlice {
    std::string name;
    int64_t beginUs;
};

// Slices the calling thread has begun and not ended yet, innermost last.
thread_local std::vector<OpenSlice> tOpenSlices;

int currentTid() {
    return static_cast<int>(syscall(SYS_gettid));
}

}  // namespace

TimelineTraceSink::TimelineTraceSink(HostClock& clock, Timeline& timeline)
    : mClock(clock), mTimeline(timeline) {}

void TimelineTraceSink::counter(const char* track, int64_t value) {
    mTimeline.recordCounter(track, value);
}

void TimelineTraceSink::beginSlice(const char* name) {
    tOpenSlices.push_back({name, mClock.nowUs()});
}

void TimelineTraceSink::endSlice() {
    if (tOpenSlices.empty()) {
        return;  // begun before this sink was installed
    }
    OpenSlice slice = std::move(tOpenSlices.back());
    tOpenSlices.pop_back();
    mTimeline.recordSlice(slice.name, slice.beginUs, mClock.nowUs(), currentTid());
}

}  // namespace velmora
