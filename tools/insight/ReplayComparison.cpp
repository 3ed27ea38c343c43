#include "tools/insight/ReplayComparison.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <map>

namespace velmora {

namespace {

std::string msText(int64_t us) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%.3f", static_cast<double>(us) / 1000.0);
    return buf;
}

}  // namespace

ReplayComparison::ReplayComparison(std::string labelA, InsightResult a, std::string labelB,
                                   InsightResult b)
    : mLabelA(std::move(labelA)), mLabelB(std::move(labelB)), mA(std::move(a)), mB(std::move(b)) {
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

const CallRef& ReplayComparison::firstDivergentCall() const {
    static const CallRef kNone;
    return mFirst >= 0 ? mB.divergentCall : kNone;
}

std::string ReplayComparison::divergenceA() const {
    return mFirst >= 0 ? whatCallDid(mA, mA.callStatus[mFirst]) : "";
}

std::string ReplayComparison::divergenceB() const {
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
    std::string out = "comparison: A = " + mLabelA + ", B = " + mLabelB + "\n";
    if (mFirst < 0) {
        out += "the runs never diverge: every call had the same status and node changes\n";
    } else {
        const CallRef& call = firstDivergentCall();
        out += "first divergence at call " + std::to_string(call.index + 1) + " [" +
               msText(call.us) + " ms] " + call.where + ": " + call.text + "\n";
        out += "  A: status " + divergenceA() + "\n  B: status " + divergenceB() + "\n";
    }
    if (mNodes.empty()) {
        out += "no node differs\n";
        return out;
    }
    char line[512];
    snprintf(line, sizeof(line), "%-26s %14s %14s  %s\n", "node", "final A", "final B",
             "held by A / B; time at value (ms) A -> B");
    out += line;
    for (const auto& diff : mNodes) {
        std::string times;
        for (size_t i = 0; i < diff.residency.size() && i < 3; ++i) {
            const ValueTime& v = diff.residency[i];
            times += " " + v.value + ":" + msText(v.aUs) + "->" + msText(v.bUs);
        }
        snprintf(line, sizeof(line), "%-26s %14s %14s  %s / %s;%s\n", diff.key.c_str(),
                 diff.finalA.c_str(), diff.finalB.c_str(), diff.heldByA.c_str(),
                 diff.heldByB.c_str(), times.c_str());
        out += line;
    }
    return out;
}

}  // namespace velmora
