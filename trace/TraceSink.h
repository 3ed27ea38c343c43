// Where the server's trace points end up. Two kinds of point: a counter (a named track that holds
// an integer over time, such as the applied special scene) and a slice (a named span of the
// calling thread, such as one velmoraEvent call). Slices nest per thread and end in reverse
// order of their beginning.
//
// On a device the points go to atrace (AtraceSink), so they appear in a systrace or Perfetto
// capture next to the frequencies and scheduler events they explain. A host program or a test
// installs a sink of its own with Trace::setSink and sees the same tracks with the same values.
//
// Called from every host thread and from the probe worker, sometimes with a manager's or the
// probe worker's lock held: implementations must be thread safe and must not call back into
// the server.
#pragma once

#include <cstdint>

namespace velmora {

class TraceSink {
public:
    virtual ~TraceSink() = default;

    // The counter `track` now holds `value`.
    virtual void counter(const char* track, int64_t value) = 0;
    // Opens a slice called `name` on the calling thread. `name` is only valid during the call.
    virtual void beginSlice(const char* name) = 0;
    // Closes the innermost slice the calling thread opened.
    virtual void endSlice() = 0;
};

}  // namespace velmora
