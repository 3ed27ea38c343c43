// What one replay found out, as plain data: per node who held its value and for how long it sat
// at each value, the spans of what stayed applied, the end-of-replay warnings and, when two runs
// are compared, a digest per call or where the second run parts from the first. Built by
// ReplayInsight::finish; read by the summary, the JSON writer, the HTML report and the
// comparison.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "tools/energy/DomainEnergy.h"

namespace velmora {

// The host call that caused something: where it is in the trace and how it reads.
struct CallRef {
    int index = -1;     // position among the replayed calls, -1 for none
    std::string where;  // "file:line"
    std::string text;   // the call as written
    int64_t us = 0;     // trace time of the call
};

struct HolderSegment {
    int64_t fromUs = 0;
    std::string value;
    std::string heldBy;  // "initial" when no request beats the node's initial value
    // Index of the call that made it, -1 for none: also for a change that fell due before the
    // call's own time (a timer running out while the clock moved on to the call).
    int call = -1;
};

struct NodeInsight {
    std::string key;
    std::string initial;
    std::string final;
    std::string heldBy;  // holder of the final value
    int changes = 0;
    bool numeric = true;
    // Time spent at each value, most time first (numeric nodes only); sums to the trace length.
    std::vector<std::pair<std::string, int64_t>> residencyUs;
    std::vector<HolderSegment> segments;  // value or holder changes, from 0 on
};

struct SpanInsight {
    std::string track;     // "scenes", "on/off commands", ... ("scenes 2" when they overlap)
    std::string category;  // "scene", "onoff", "action", "probe", "memlat"
    std::string name;
    int64_t beginUs = 0;
    int64_t endUs = 0;
    bool open = false;  // still applied at the end of the trace
    // The call that applied it, when known, and whether it ended by running out its duration.
    CallRef call;
    bool expired = false;
};

struct StuckWarning {
    std::string
        kind;  // "scene", "governor_scene", "onoff", "client_limit", "probe_boost", "memlat"
    std::string message;
    CallRef call;  // the call that applied it
};

struct InsightResult {
    int64_t endUs = 0;  // trace length
    std::vector<NodeInsight> nodes;
    std::vector<SpanInsight> spans;
    std::vector<StuckWarning> warnings;
    int callCount = 0;  // calls replayed
    // Per domain with an energy table, when the trace had load lines (EnergyModel); else empty.
    std::vector<DomainEnergy> energy;
    // Only when the analysis was asked to keep them (the first run of a comparison): per call its
    // status, and a digest of its status and of every node change it caused.
    std::vector<int> callStatus;
    std::vector<uint64_t> callDigests;
    // Only when the analysis was given an earlier run's digests (the second run of a comparison):
    // the first call whose digest differs (index -1: none), and its status here.
    CallRef divergentCall;
    int divergentStatus = 0;

    const NodeInsight* node(const std::string& key) const {
        for (const auto& n : nodes) {
            if (n.key == key)
                return &n;
        }
        return nullptr;
    }
};

}  // namespace velmora
