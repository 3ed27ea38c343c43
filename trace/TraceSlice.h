// Scoped trace slice: the slice every host entry point opens for the length of the call.
#pragma once

#include "trace/Trace.h"

namespace velmora {

// A slice for the lifetime of the object, on the thread that creates it. Tests the gate once;
// when tracing is off it neither formats nor calls anything.
class TraceSlice {
public:
    explicit TraceSlice(const char* name) : mOpen(Trace::enabled()) {
        if (mOpen) {
            Trace::beginSlice(name);
        }
    }
    TraceSlice(const char* name, const char* key, int value) : mOpen(Trace::enabled()) {
        if (mOpen) {
            Trace::beginSlice(name, key, value);
        }
    }
    ~TraceSlice() {
        if (mOpen) {
            Trace::endSlice();
        }
    }
    TraceSlice(const TraceSlice&) = delete;
    TraceSlice& operator=(const TraceSlice&) = delete;

private:
    // Whether this slice was begun: a slice that began while tracing was on is ended even if it
    // has been switched off since, and one that did not begin is never ended.
    const bool mOpen;
};

}  // namespace velmora
