// The device's trace sink: atrace from libcutils, under the tag Trace::kAtraceTag. Each point
// becomes a line of the kernel's trace_marker ("C|pid|track|value", "B|pid|name", "E|pid"),
// which systrace and Perfetto turn into counter tracks and slices of the host service process.
//
// On a Linux host, libcutils' atrace is a stub that never reports a tag as enabled and writes
// nothing; the sink is built and linked there all the same, so both builds carry the same code.
#pragma once

#include "trace/TraceSink.h"

namespace velmora {

class AtraceSink : public TraceSink {
public:
    void counter(const char* track, int64_t value) override;
    void beginSlice(const char* name) override;
    void endSlice() override;
};

}  // namespace velmora
