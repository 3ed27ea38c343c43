// The host's trace sink: puts the server's trace points on the host timeline, under the names
// and with the values a device capture shows (see trace/ServerTrace.h), so a replay and a
// device trace of the same events can be laid side by side.
//
// Counters become server counter tracks; a slice is kept open per thread (a thread-local stack)
// and recorded as one complete event when it ends, timed by the host clock, so slices of a
// replay in virtual time are exact. Thread safe: the open slices belong to their thread, the
// timeline locks itself. HostEnvironment installs its sink for the life of the process.
#pragma once

#include "host/time/HostClock.h"
#include "host/record/Timeline.h"
#include "trace/TraceSink.h"

namespace velmora {

class TimelineTraceSink : public TraceSink {
public:
    TimelineTraceSink(HostClock& clock, Timeline& timeline);

    void counter(const char* track, int64_t value) override;
    void beginSlice(const char* name) override;
    void endSlice() override;

private:
    HostClock& mClock;
    Timeline& mTimeline;
};

}  // namespace velmora
