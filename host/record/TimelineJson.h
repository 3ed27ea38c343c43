// Chrome's JSON trace format for the timeline's events, which Perfetto's UI opens: the opening
// of the file (the three processes' names), one element of the "traceEvents" array per event,
// and the closing. Elements carry no separator: the writer puts ",\n" before each.
//
// Processes: 1 "device nodes" (a counter track per numeric node, instants for text nodes),
// 2 "events" (instants on thread 0, spans on named threads from 1), 3 "velmora server" (the
// server's counter tracks and its slices on the thread that made them).
#pragma once

#include <cstdint>
#include <string>

namespace velmora {

class TimelineJson {
public:
    static constexpr int kNodePid = 1;
    static constexpr int kEventPid = 2;
    static constexpr int kServerPid = 3;

    static std::string opening();
    static std::string closing();

    // A numeric node's value; `source` (may be "") names its holder, in the category because
    // counter args must all be numbers.
    static std::string nodeCounter(const std::string& key, double value, int64_t us,
                                   const std::string& source);
    // A text node's value (a governor): an instant on the node track.
    static std::string nodeText(const std::string& key, const std::string& text, int64_t us);
    static std::string serverCounter(const std::string& track, int64_t value, int64_t us);
    static std::string serverSlice(const std::string& name, int64_t beginUs, int64_t endUs,
                                   int tid);
    static std::string instant(const std::string& category, const std::string& name, int64_t us);
    // The name of span thread `tid` of the "events" process, and one span on it.
    static std::string spanTrack(int tid, const std::string& track);
    static std::string span(const std::string& category, const std::string& name, int64_t beginUs,
                            int64_t endUs, int tid);

    static std::string escape(const std::string& text);
};

}  // namespace velmora
