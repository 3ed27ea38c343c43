#include "tools/insight/FirstDivergence.h"

#include <cstdio>
#include <limits>

namespace velmora {

std::string FirstDivergence::millis(int64_t us) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%.3f", static_cast<double>(us) / 1000.0);
    return buf;
}

namespace {

std::string msText(int64_t us) {
    return FirstDivergence::millis(us) + " ms";
}

// The value `segments` hold right after everything that happened at `us`.
const HolderSegment* valueAt(const std::vector<HolderSegment>& segments, int64_t us) {
    const HolderSegment* at = nullptr;
    for (const auto& segment : segments) {
        if (segment.fromUs > us)
            break;
        at = &segment;
    }
    return at;
}

// The earliest time at which the two histories hold different values, -1 when never.
int64_t firstDifference(const std::vector<HolderSegment>& a, const std::vector<HolderSegment>& b) {
    size_t i = 0, j = 0;
    const std::string* valueA = nullptr;
    const std::string* valueB = nullptr;
    while (i < a.size() || j < b.size()) {
        const int64_t next =
            std::min(i < a.size() ? a[i].fromUs : std::numeric_limits<int64_t>::max(),
                     j < b.size() ? b[j].fromUs : std::numeric_limits<int64_t>::max());
        while (i < a.size() && a[i].fromUs == next)
            valueA = &a[i++].value;
        while (j < b.size() && b[j].fromUs == next)
            valueB = &b[j++].value;
        if (valueA == nullptr || valueB == nullptr || *valueA != *valueB)
            return next;
    }
    return -1;
}

}  // namespace

FirstDivergence::FirstDivergence(const InsightResult& a, const InsightResult& b) {
    const NodeInsight* nodeA = nullptr;
    const NodeInsight* nodeB = nullptr;
    for (const auto& node : a.nodes) {
        const NodeInsight* other = b.node(node.key);
        if (other == nullptr)
            continue;
        const int64_t us = firstDifference(node.segments, other->segments);
        if (us >= 0 && (mUs < 0 || us < mUs)) {
            mUs = us;
            nodeA = &node;
            nodeB = other;
        }
    }
    if (mUs < 0)
        return;
    mNode = nodeA->key;
    bool callA = false, callB = false;
    mA = describe(a, *nodeA, mUs, &callA);
    mB = describe(b, *nodeB, mUs, &callB);
    mTimed = !callA && !callB;
}

std::string FirstDivergence::describe(const InsightResult& run, const NodeInsight& node, int64_t us,
                                      bool* byCall) {
    *byCall = false;
    const HolderSegment* now = valueAt(node.segments, us);
    if (now == nullptr)
        return "no value";
    if (now->fromUs != us)
        return "stays " + now->value + ", held by " + now->heldBy;
    if (now->call >= 0) {
        *byCall = true;
        return now->value + ", set by call " + std::to_string(now->call + 1) + ", held by " +
               now->heldBy;
    }
    // Between calls only a timer moves a node: find what ran out then.
    for (const auto& span : run.spans) {
        if (span.open || span.endUs != us)
            continue;
        std::string out = now->value + ": " + (span.category == "action" ? "action " : "") +
                          span.name + (span.expired ? " expired" : " ended") + " after " +
                          msText(span.endUs - span.beginUs);
        if (span.call.index >= 0)
            out += " (applied by " + span.call.where + " [" + msText(span.call.us) +
                   "]: " + span.call.text + ")";
        return out;
    }
    return now->value + ": a timed change, held by " + now->heldBy;
}

}  // namespace velmora
