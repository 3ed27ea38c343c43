#include "trace/Trace.h"

#include <cstdio>

#include "trace/AtraceSink.h"

namespace velmora {

namespace {

// Longest slice name: an entry point's name and one number, with room to spare.
constexpr size_t kMaxSliceName = 64;

// Made on first use and never destroyed: the probe worker lives as long as the process and may
// still trace while exit runs the destructors of static objects.
TraceSink& atraceSink() {
    static AtraceSink* const sSinkOfTheDevice = new AtraceSink();
    return *sSinkOfTheDevice;
}

}  // namespace

std::atomic<uint64_t> Trace::sOwnSinkTags{0};
std::atomic<TraceSink*> Trace::sSink{nullptr};

TraceSink& Trace::sink() {
    TraceSink* installed = sSink.load(std::memory_order_acquire);
    return installed != nullptr ? *installed : atraceSink();
}

void Trace::counter(const char* track, int64_t value) {
    sink().counter(track, value);
}

void Trace::beginSlice(const char* name) {
    sink().beginSlice(name);
}

void Trace::beginSlice(const char* name, const char* key, int value) {
    char text[kMaxSliceName];
    snprintf(text, sizeof(text), "%s %s=%d", name, key, value);
    sink().beginSlice(text);
}

void Trace::endSlice() {
    sink().endSlice();
}

void Trace::setSink(TraceSink* sink) {
    sSink.store(sink, std::memory_order_release);
    sOwnSinkTags.store(sink != nullptr ? kAtraceTag : 0, std::memory_order_relaxed);
}

}  // namespace velmora
