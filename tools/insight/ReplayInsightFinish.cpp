// The end of a replay: residency, open spans, stuck-state warnings.
#include <algorithm>
#include <map>

#include "config/CommandKind.h"
#include "host/record/Timeline.h"
#include "tools/insight/ReplayInsight.h"

namespace velmora {

namespace {

const char* trackOf(const std::string& category) {
    if (category == "scene")
        return "scenes";
    if (category == "onoff")
        return "on/off commands";
    if (category == "memlat")
        return "memory latency";
    if (category == "probe")
        return "probe boosts";
    return "timed actions";
}

// Spreads the spans of each track over lanes ("scenes", "scenes 2", ...) so that the spans of one
// lane nest, as slices of one thread must: a span goes to the first lane where it lies inside
// the innermost span still open there, or after it.
void packIntoLanes(std::vector<SpanInsight>* spans) {
    std::stable_sort(spans->begin(), spans->end(), [](const SpanInsight& a, const SpanInsight& b) {
        if (a.track != b.track)
            return a.track < b.track;
        if (a.beginUs != b.beginUs)
            return a.beginUs < b.beginUs;
        return a.endUs > b.endUs;
    });
    std::map<std::string, std::vector<std::vector<int64_t>>> lanes;  // track -> lane -> open ends
    for (auto& span : *spans) {
        auto& trackLanes = lanes[span.track];
        size_t lane = 0;
        for (; lane < trackLanes.size(); ++lane) {
            auto& open = trackLanes[lane];
            while (!open.empty() && open.back() <= span.beginUs)
                open.pop_back();
            if (open.empty() || open.back() >= span.endUs)
                break;
        }
        if (lane == trackLanes.size())
            trackLanes.emplace_back();
        trackLanes[lane].push_back(span.endUs);
        if (lane > 0)
            span.track += " " + std::to_string(lane + 1);
    }
}

std::string applied(const CallRef& call) {
    if (call.index < 0)
        return "";
    return " (applied by " + call.where + ": " + call.text + ")";
}

}  // namespace

InsightResult ReplayInsight::finish() {
    const int64_t end = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    InsightResult result;
    result.endUs = end;
    for (const auto& key : mOrder) {
        NodeTrack& track = mTracks.at(key);
        NodeInsight node;
        node.key = key;
        node.initial = track.initial;
        node.final = track.value;
        node.heldBy = track.holder;
        node.changes = track.changes;
        node.segments = std::move(track.segments);
        std::map<std::string, int64_t> residency;
        for (size_t i = 0; i < node.segments.size(); ++i) {
            double ignored = 0;
            if (!parseNodeNumber(node.segments[i].value, &ignored))
                node.numeric = false;
            const int64_t from = std::min(node.segments[i].fromUs, end);
            const int64_t to =
                i + 1 < node.segments.size() ? std::min(node.segments[i + 1].fromUs, end) : end;
            residency[node.segments[i].value] += to - from;
        }
        if (node.numeric) {
            for (const auto& entry : residency) {
                if (entry.second > 0)  // values passed through within an instant: no time
                    node.residencyUs.push_back(entry);
            }
            std::stable_sort(node.residencyUs.begin(), node.residencyUs.end(),
                             [](const auto& a, const auto& b) { return a.second > b.second; });
        }
        result.nodes.push_back(std::move(node));
    }
    result.spans = std::move(mSpans);
    for (const auto& entry : mApplied) {
        result.spans.push_back({"", entry.second.category, entry.second.name, entry.second.beginUs,
                                end, true, entry.second.call});
    }
    for (const auto& entry : mOnOff) {
        result.spans.push_back(
            {"", "onoff", entry.second.name, entry.second.beginUs, end, true, entry.second.call});
    }
    for (const auto& entry : mBoosts) {
        result.spans.push_back(
            {"", "probe", entry.second.name, entry.second.beginUs, end, true, entry.second.call});
    }
    for (auto& span : result.spans) {
        if (span.track.empty())
            span.track = trackOf(span.category);
    }
    packIntoLanes(&result.spans);
    stuckWarningsLocked(&result);
    // finish() ends the analysis: the records move out rather than being copied.
    result.callCount = mCallCount;
    result.callDigests = std::move(mDigests);
    result.callStatus = std::move(mStatus);
    result.divergentCall = mDivergentCall;
    result.divergentStatus = mDivergentStatus;
    return result;
}

void ReplayInsight::stuckWarningsLocked(InsightResult* result) const {
    auto warn = [&](const char* kind, const std::string& message, const CallRef& call) {
        result->warnings.push_back({kind, message + applied(call), call});
    };
    for (const auto& entry : mApplied) {
        const int cmdId = entry.first;
        const Applied& a = entry.second;
        if (a.category == "scene" && isGovernorSceneId(cmdId) && mSwitchedOff.count(cmdId) != 0) {
            warn("governor_scene",
                 "governor scene " + a.name +
                     " is still applied although it was switched off: the server does not "
                     "withdraw a governor scene while scene 4119 is current",
                 a.call);
        } else if (a.category == "scene") {
            warn("scene", "scene " + a.name + " was never withdrawn", a.call);
        } else if (a.category == "memlat") {
            warn("memlat", "memory-latency action " + a.name + " was never withdrawn", a.call);
        }
    }
    for (const auto& entry : mOnOff) {
        warn("onoff", "on/off command " + entry.second.name + " was left on", entry.second.call);
    }
    for (const auto& standing : mLedger.clientRequests()) {
        warn("client_limit",
             "client " + standing.label + " never released " + standing.key + "=" +
                 std::to_string(standing.request.value),
             standing.request.call);
    }
    for (const auto& entry : mBoosts) {
        warn("probe_boost",
             "probe boost of thread " + std::to_string(entry.first) +
                 " is still applied at the end of the trace",
             entry.second.call);
    }
}

std::string ReplayInsight::holderAt(const InsightResult& result, const std::string& key,
                                    int64_t us) {
    const NodeInsight* node = result.node(key);
    if (node == nullptr)
        return "";
    std::string holder;
    for (const auto& segment : node->segments) {
        if (segment.fromUs > us)
            break;
        holder = segment.heldBy;
    }
    return holder;
}

ChangeHolders ReplayInsight::holdersByChange(const InsightResult& result) {
    ChangeHolders out;
    for (const auto& node : result.nodes) {
        for (size_t i = 0; i < node.segments.size(); ++i) {
            const HolderSegment& segment = node.segments[i];
            if (i == 0 || segment.value != node.segments[i - 1].value) {
                out.add(node.key, segment.heldBy);
            } else if (segment.fromUs == node.segments[i - 1].fromUs) {
                out.replaceLast(node.key,
                                segment.heldBy);  // the holder changed in the same instant
            }
        }
    }
    return out;
}

}  // namespace velmora
