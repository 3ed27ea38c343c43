// The differences between two replays of one trace under two configurations: per node the final
// value, its holder and the time spent at each value, and the first call after which the device
// went different ways (a different status or different node changes). Run A kept its calls'
// digests and statuses, run B was compared with A's digests as it went (ReplayInsight).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "tools/insight/InsightResult.h"

namespace velmora {

class ReplayComparison {
public:
    struct ValueTime {
        std::string value;
        int64_t aUs = 0;
        int64_t bUs = 0;
    };
    struct NodeDiff {
        std::string key;
        std::string finalA, finalB;
        std::string heldByA, heldByB;
        std::vector<ValueTime> residency;  // values whose time differs, largest change first
    };

    ReplayComparison(std::string labelA, InsightResult a, std::string labelB, InsightResult b);

    // Nodes whose final value, holder or residency differ, in node order.
    const std::vector<NodeDiff>& nodes() const { return mNodes; }
    bool diverges() const { return mFirst >= 0; }
    const CallRef& firstDivergentCall() const;
    // What the diverging call did in each run: status and node changes ("0 cpu.big.max=...").
    std::string divergenceA() const;
    std::string divergenceB() const;

    const std::string& labelA() const { return mLabelA; }
    const std::string& labelB() const { return mLabelB; }
    const InsightResult& a() const { return mA; }
    const InsightResult& b() const { return mB; }

    // Human-readable report for the terminal.
    std::string text() const;

private:
    // The status and the node changes of the diverging call in `run`.
    std::string whatCallDid(const InsightResult& run, int status) const;

    std::string mLabelA, mLabelB;
    InsightResult mA, mB;
    std::vector<NodeDiff> mNodes;
    int mFirst = -1;
};

}  // namespace velmora
