// The library's trace points: one gate, enabled(), that every point tests first, and the calls
// that hand a point to the installed sink (atrace unless a host program or a test installed one).
//
// Cheap when nobody traces: enabled() is one load of atrace's enabled tags (a call into
// libcutils reading shared memory on a device), one load of a word that is 0 unless a sink of
// our own is installed, and one branch that is predicted not taken. No lock, no allocation and
// no formatting happens before that branch; every point formats its text only behind it.
//
// Thread safe. Install a sink before the server starts and remove it after the server and its
// probe worker have stopped: a point that passed the gate may still be using the old sink.
#pragma once

#include <cutils/trace.h>

#include "platform/VelmoraExport.h"

#include <atomic>
#include <cstdint>

// 0 compiles every trace point out. Only the benchmarks build the library that way, as the
// floor that the tracing-off cost of the real library is measured against.
#ifndef VELMORA_TRACE_POINTS
#define VELMORA_TRACE_POINTS 1
#endif

namespace velmora {

class TraceSink;

// The library's own: only setSink is exported, for the host layer and the tests.
class Trace {
public:
    // The power category: the one people enable to see why frequencies and power states change
    // ("atrace power freq sched", Perfetto's atrace_categories: "power"). The server is the
    // vendor's power and performance component, and its tracks explain exactly those changes.
    // Not the hal category: that one switches on every hardware service's slices at once.
    static constexpr uint64_t kAtraceTag = ATRACE_TAG_POWER;

    // True while someone is tracing: atrace has the power tag on, or a sink of our own is
    // installed.
    static bool enabled() {
#if VELMORA_TRACE_POINTS
        const uint64_t tags =
            atrace_get_enabled_tags() | sOwnSinkTags.load(std::memory_order_relaxed);
        return CC_UNLIKELY((tags & kAtraceTag) != 0);
#else
        return false;
#endif
    }

    // Hand one point to the sink. Callers test enabled() first.
    static void counter(const char* track, int64_t value);
    static void beginSlice(const char* name);
    // Begins the slice "<name> <key>=<value>" (longer text is cut).
    static void beginSlice(const char* name, const char* key, int value);
    static void endSlice();

    // Sends every later point to `sink` instead of atrace, or back to atrace when null. The
    // caller keeps ownership; `sink` must outlive its installation (see above).
    VELMORA_EXPORT static void setSink(TraceSink* sink);

private:
    static TraceSink& sink();

    // kAtraceTag while a sink of our own is installed, else 0.
    static std::atomic<uint64_t> sOwnSinkTags;
    static std::atomic<TraceSink*> sSink;  // null: atrace
};

}  // namespace velmora
