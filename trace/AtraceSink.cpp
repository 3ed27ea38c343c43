#include "trace/AtraceSink.h"

#include "trace/Trace.h"

namespace velmora {

// The inline atrace helpers test the tag once more; the points only get here when it is on, so
// the second test is always taken and costs nothing next to the write to trace_marker.
void AtraceSink::counter(const char* track, int64_t value) {
    atrace_int64(Trace::kAtraceTag, track, value);
}

void AtraceSink::beginSlice(const char* name) {
    atrace_begin(Trace::kAtraceTag, name);
}

void AtraceSink::endSlice() {
    atrace_end(Trace::kAtraceTag);
}

}  // namespace velmora
