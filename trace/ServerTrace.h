// The server's counter tracks: their names and the points that set them (docs/tracing.md lists
// the tracks and their values). The host timeline carries the same tracks under the same names
// (it is fed through a TraceSink), so a device capture and a host replay of the same events line
// up track by track.
//
// Each point tests Trace::enabled() inline and does its work out of line, so a call site costs
// one predicted branch while nobody traces. Callers may hold their own lock; the points take
// none.
#pragma once

#include <cstddef>

#include "trace/Trace.h"

namespace velmora {

class ServerTrace {
public:
    static constexpr const char* kSceneTrack = "velmora.scene";
    static constexpr const char* kProbeBoostedTrack = "velmora.probe.boosted";

    // The applied special scene changed to `cmdId` (0: none).
    static void scene(int cmdId) {
        if (Trace::enabled()) {
            Trace::counter(kSceneTrack, cmdId);
        }
    }
    // The platform accepted these merged (tag, value) pairs.
    static void freqLimits(int count, const int* tags, const int* values) {
        if (Trace::enabled()) {
            traceFreqLimits(count, tags, values);
        }
    }
    // The platform accepted these (group, level) pairs.
    static void schedLevels(int count, const int* groups, const int* levels) {
        if (Trace::enabled()) {
            traceSchedLevels(count, groups, levels);
        }
    }

    // Track names of a frequency tag and a scheduler group: "velmora.freq.little_cpu_max",
    // "velmora.sched.top_app"; a tag or group without a name gets its number
    // ("velmora.freq.tag30"). Returns `buf`.
    static const char* freqTrack(int tag, char* buf, size_t size);
    static const char* schedTrack(int group, char* buf, size_t size);

private:
    static void traceFreqLimits(int count, const int* tags, const int* values);
    static void traceSchedLevels(int count, const int* groups, const int* levels);
};

}  // namespace velmora
