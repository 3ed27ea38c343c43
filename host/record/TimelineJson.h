// Chrome's JSON trace format for the timeline's events, which Perfetto's UI opens: the opening
// of the file (the three processes' names), one element of the "traceEvents" array per event,
// and the closing. Elements carry no separator: the writer puts ",\n" before each.
//
// Every function appends its text to `out`, so that a writer can fill one buffer for millions
// of events without a string per event.
//
// Processes: 1 "device nodes" (a counter track per numeric node, instants for text nodes),
// 2 "events" (instants on thread 0, spans on named threads from 1), 3 "velmora server" (the
// server's counter tracks and its slices on the thread that made them).
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace velmora {

class TimelineJson {
public:
    static constexpr int kNodePid = 1;
    static constexpr int kEventPid = 2;
    static constexpr int kServerPid = 3;

    static void opening(std::string& out);
    static void closing(std::string& out);

    // A numeric node's value, `number` being its text as formatNumber() gives it; `source`
    // (may be "") names its holder, in the category because counter args must all be numbers.
    static void nodeCounter(std::string& out, std::string_view key, std::string_view number,
                            int64_t us, std::string_view source);
    // A text node's value (a governor): an instant on the node track.
    static void nodeText(std::string& out, std::string_view key, std::string_view text,
                         int64_t us);
    static void serverCounter(std::string& out, std::string_view track, int64_t value,
                              int64_t us);
    static void serverSlice(std::string& out, std::string_view name, int64_t beginUs,
                            int64_t endUs, int64_t tid);
    static void instant(std::string& out, std::string_view category, std::string_view name,
                        int64_t us);
    // The name of span thread `tid` of the "events" process, and one span on it.
    static void spanTrack(std::string& out, int tid, std::string_view track);
    static void span(std::string& out, std::string_view category, std::string_view name,
                     int64_t beginUs, int64_t endUs, int tid);

    // A node value as a counter shows it: 17 significant digits ("%.17g"), so that it reads
    // back as the same double.
    static std::string formatNumber(double value);
    static void appendInteger(std::string& out, int64_t value);
    // `text` as the inside of a JSON string.
    static void appendEscaped(std::string& out, std::string_view text);
    static std::string escape(const std::string& text);
};

}  // namespace velmora
