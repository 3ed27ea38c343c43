// Records what the simulated or real device went through: every node write with its trace time,
// and instant events (report lines of the device event log, scene changes, timed actions, host
// calls of a replay). Produces the per-node summary and a timeline in Chrome's JSON trace format
// (counter track per numeric node, instant events for the rest), which Perfetto's UI opens.
//
// Written by the device tree, the executor and the event log from any thread: thread safe.
#pragma once

#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include "host/HostClock.h"

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

    explicit Timeline(HostClock& clock);

    // Forgets everything recorded.
    void clear();
    // The value a node had when the layer first saw it. Later calls for the key are ignored.
    void recordInitial(const std::string& key, const std::string& path, const std::string& text);
    // A write that changed the node's value.
    void recordWrite(const std::string& key, const std::string& path, const std::string& text);
    void recordInstant(const std::string& category, const std::string& name);

    // One entry per node seen, in order of first appearance.
    std::vector<NodeSummary> summary() const;
    std::vector<Instant> instants(const std::string& category) const;
    // Number of changing writes recorded for `key`.
    int changes(const std::string& key) const;

    std::string chromeJson() const;
    // Writes chromeJson() to `path`. False (with `error` set) when the file cannot be written.
    bool writeChromeJson(const std::string& path, std::string* error) const;

private:
    struct Sample {
        int64_t us;
        std::string text;
    };
    struct Track {
        std::string key;
        std::string path;
        std::vector<Sample> samples;  // samples[0] is the initial value
    };

    Track* findTrack(const std::string& key);

    HostClock& mClock;
    mutable std::mutex mLock;  // guards mTracks and mInstants
    std::vector<Track> mTracks;
    std::vector<Instant> mInstants;
};

// Parses `text` as a number (integer or decimal). False for anything else.
bool parseNodeNumber(const std::string& text, double* value);

}  // namespace velmora
