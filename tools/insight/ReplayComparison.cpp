#include "tools/insight/ReplayComparison.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <map>

namespace velmora {

ReplayComparison::ReplayComparison(std::string labelA, InsightResult a, std::string labelB,
                                   InsightResult b)
    : mLabelA(std::move(labelA)),
      mLabelB(std::move(labelB)),
      mA(std::move(a)),
      mB(std::move(b)),
      mTimed(mA, mB) {
    for (const auto& nodeA : mA.nodes) {
        const NodeInsight* nodeB = mB.node(nodeA.key);
        if (nodeB == nullptr)
            continue;
        NodeDiff diff{nodeA.key, nodeA.final, nodeB->final, nodeA.heldBy, nodeB->heldBy, {}};
        std::map<std::string, ValueTime> times;
        for (const auto& entry : nodeA.residencyUs)
            times[entry.first].aUs = entry.second;
        for (const auto& entry : nodeB->residencyUs)
            times[entry.first].bUs = entry.second;
        for (auto& entry : times) {
            entry.second.value = entry.first;
            if (entry.second.aUs != entry.second.bUs)
                diff.residency.push_back(entry.second);
        }
        std::stable_sort(diff.residency.begin(), diff.residency.end(),
                         [](const ValueTime& x, const ValueTime& y) {
                             return std::llabs(x.bUs - x.aUs) > std::llabs(y.bUs - y.aUs);
                         });
        if (diff.finalA != diff.finalB || diff.heldByA != diff.heldByB || !diff.residency.empty())
            mNodes.push_back(std::move(diff));
    }
    // Both runs replayed the same trace, so the call B parted at is the same call of A.
    if (mB.divergentCall.index >= 0 &&
        static_cast<size_t>(mB.divergentCall.index) < mA.callStatus.size())
        mFirst = mB.divergentCall.index;
}

bool ReplayComparison::timedFirst() const {
    return mTimed.found() && mTimed.timed() && (mFirst < 0 || mTimed.us() < mB.divergentCall.us);
}

int64_t ReplayComparison::divergenceUs() const {
    if (timedFirst())
        return mTimed.us();
    return mFirst >= 0 ? mB.divergentCall.us : -1;
}

const CallRef& ReplayComparison::firstDivergentCall() const {
    static const CallRef kNone;
    return mFirst >= 0 && !timedFirst() ? mB.divergentCall : kNone;
}

std::string ReplayComparison::divergenceA() const {
    if (timedFirst())
        return mTimed.node() + " " + mTimed.a();
    return mFirst >= 0 ? whatCallDid(mA, mA.callStatus[mFirst]) : "";
}

std::string ReplayComparison::divergenceB() const {
    if (timedFirst())
        return mTimed.node() + " " + mTimed.b();
    return mFirst >= 0 ? whatCallDid(mB, mB.divergentStatus) : "";
}

std::string ReplayComparison::whatCallDid(const InsightResult& run, int status) const {
    std::string out = std::to_string(status);
    for (const auto& node : run.nodes) {
        for (size_t i = 1; i < node.segments.size(); ++i) {
            if (node.segments[i].call == mFirst &&
                node.segments[i].value != node.segments[i - 1].value)
                out += " " + node.key + "=" + node.segments[i].value;
        }
    }
    return out;
}

std::string ReplayComparison::text() const {
    return headline() + divergenceText() + nodesText();
}

std::string ReplayComparison::headline() const {
    return "comparison: A = " + mLabelA + ", B = " + mLabelB + "\n";
}

std::string ReplayComparison::divergenceText() const {
    std::string out;
    if (timedFirst()) {
        out += "first divergence at " + FirstDivergence::millis(mTimed.us()) +
               " ms, a timed change of " + mTimed.node() + "\n";
        out += "  A: " + mTimed.a() + "\n  B: " + mTimed.b() + "\n";
    } else if (mFirst >= 0) {
        const CallRef& call = firstDivergentCall();
        out += "first divergence at call " + std::to_string(call.index + 1) + " [" +
               FirstDivergence::millis(call.us) + " ms] " + call.where + ": " + call.text + "\n";
        out += "  A: status " + divergenceA() + "\n  B: status " + divergenceB() + "\n";
    } else {
        out += "the runs never diverge: every call had the same status and node changes\n";
        if (!mOverrides.empty()) {
            out += "the configurations differ, but these trace lines override the difference:\n";
            for (const auto& line : mOverrides)
                out += "  " + line + "\n";
        }
    }
    return out;
}

std::string ReplayComparison::nodesText() const {
    if (mNodes.empty())
        return "no node differs\n";
    std::string out;
    char line[512];
    snprintf(line, sizeof(line), "%-26s %14s %14s  %s\n", "node", "final A", "final B",
             "held by A / B; time at value (ms) A -> B");
    out += line;
    for (const auto& diff : mNodes) {
        std::string times;
        for (size_t i = 0; i < diff.residency.size() && i < 3; ++i) {
            const ValueTime& v = diff.residency[i];
            times += " " + v.value + ":" + FirstDivergence::millis(v.aUs) + "->" +
                     FirstDivergence::millis(v.bUs);
        }
        snprintf(line, sizeof(line), "%-26s %14s %14s  %s / %s;%s\n", diff.key.c_str(),
                 diff.finalA.c_str(), diff.finalB.c_str(), diff.heldByA.c_str(),
                 diff.heldByB.c_str(), times.c_str());
        out += line;
    }
    return out;
}

}  // namespace velmora
