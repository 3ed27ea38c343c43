// Records what the simulated or real device went through: every node write with its trace time,
// instant events (report lines of the device event log, scene changes, timed actions, host
// calls of a replay), and the server's own trace tracks (counters and slices, under the names a
// device capture shows them; fed by TimelineTraceSink). Produces the per-node summary and a
// timeline in Chrome's JSON trace format (counter track per numeric node and per server counter,
// complete events for server slices, instant events for the rest), which Perfetto's UI opens.
//
// Node writes stay in memory (a time and a shared value each: they are what changed). Everything
// recorded per call (server counters and slices, instants, spans) goes to an EventSpool as it
// comes, so a long replay holds a few chunks of it, and is read back for the file and the
// queries below.
//
// Written by the device tree, the executor and the event log from any thread: thread safe.
#pragma once

#include <cstdint>
#include <cstdio>
#include <functional>
#include <mutex>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "host/record/EventSpool.h"
#include "host/time/HostClock.h"

namespace velmora {

class Timeline {
public:
    struct Instant {
        int64_t us;
        std::string category;  // "report", "scene", "action", "call", "node"
        std::string name;
    };
    struct NodeSummary {
        std::string key;
        std::string path;
        std::string initial;
        std::string final;
        int changes = 0;
        bool numeric = true;  // every value parsed as a number; min/max valid
        double min = 0;
        double max = 0;
    };
    struct CounterSample {
        int64_t us;
        int64_t value;
    };
    struct Slice {
        int64_t beginUs;
        int64_t endUs;
        int tid;
        std::string name;
    };

    explicit Timeline(HostClock& clock);

    // Forgets everything recorded.
    void clear();
    // The value a node had when the layer first saw it. Later calls for the key are ignored.
    void recordInitial(const std::string& key, const std::string& path, const std::string& text);
    // A write that changed the node's value.
    void recordWrite(const std::string& key, const std::string& path, const std::string& text);
    void recordInstant(std::string_view category, std::string_view name);
    // A server counter track took `value`; a server slice of thread `tid` ended.
    void recordCounter(std::string_view track, int64_t value);
    void recordSlice(std::string_view name, int64_t beginUs, int64_t endUs, int tid);

    // One entry per node seen, in order of first appearance.
    std::vector<NodeSummary> summary() const;
    // Read back from the spool: instants of one category in order, the values server counter
    // `track` took in order, the server's slices in order of their end.
    std::vector<Instant> instants(const std::string& category) const;
    // Number of changing writes recorded for `key`.
    int changes(const std::string& key) const;
    std::vector<CounterSample> counter(const std::string& track) const;
    std::vector<Slice> slices() const;

    // A span of something that stayed applied (a scene, an on/off command, a timed action, a
    // probe boost), drawn as a slice on the named track of the "events" process. Spans of one
    // track must nest.
    void recordSpan(const std::string& track, const std::string& category, const std::string& name,
                    int64_t beginUs, int64_t endUs);
    // Names the source that held a node's value in the sample-th sample of its track (0: the
    // initial value, then one per change); counter samples carry it as their category. Unset:
    // counters carry none.
    using CounterSource = std::function<std::string(const std::string& key, size_t sample)>;
    void setCounterSource(CounterSource source);

    std::string chromeJson() const;
    // Writes chromeJson() to `path` as it goes, without holding the whole text. False (with
    // `error` set) when the file cannot be written or the spool cannot be read back.
    bool writeChromeJson(const std::string& path, std::string* error) const;

private:
    // A distinct node value, shared by every sample that has it.
    struct Value {
        std::string text;
        bool numeric = false;
        double number = 0;
    };
    struct Sample {
        int64_t us;
        uint32_t value;  // index in mValues
    };
    struct Track {
        std::string key;
        std::string path;
        std::vector<Sample> samples;  // samples[0] is the initial value
    };
    // Spool groups: one each for instants, slices and spans, then one per server counter track.
    static constexpr size_t kInstantGroup = 0;
    static constexpr size_t kSliceGroup = 1;
    static constexpr size_t kSpanGroup = 2;
    static constexpr size_t kFirstCounterGroup = 3;

    Track* findTrackLocked(const std::string& key);
    uint32_t valueLocked(const std::string& text);
    size_t counterGroupLocked(std::string_view track);
    // Appends the file's text to `out`; with `file`, hands it over as it grows (`written`
    // false when a write failed). False when the spool could not be read back whole.
    bool writeLocked(std::string& out, FILE* file, bool* written) const;

    HostClock& mClock;
    mutable std::mutex mLock;  // guards everything below
    std::vector<Track> mTracks;
    std::vector<Value> mValues;
    std::unordered_map<std::string, uint32_t> mValueIds;
    std::vector<std::string> mCounters;  // server counter tracks, in order of first sample
    EventSpool mSpool;
    CounterSource mCounterSource;
};

// Parses `text` as a number (integer or decimal). False for anything else.
bool parseNodeNumber(const std::string& text, double* value);

}  // namespace velmora
