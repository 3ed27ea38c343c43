// The differences between two replays of one trace under two configurations: per node the final
// value, its holder and the time spent at each value, and the first call after which the device
// went different ways (a different status or different node changes). Run A kept its calls'
// digests and statuses, run B was compared with A's digests as it went (ReplayInsight). A node
// that a timer moved in one run and not the other (an action expiring earlier) parts the runs at
// the timer's own time, before the next call (FirstDivergence).
//
// The terminal text is made of sections, in this order: headline(), then whatever a caller puts
// first, then divergenceText() and nodesText().
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "tools/insight/FirstDivergence.h"
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
    bool diverges() const { return mFirst >= 0 || timedFirst(); }
    // The runs part at a timed change (no call made it), told by timedDivergence().
    bool timedFirst() const;
    const FirstDivergence& timedDivergence() const { return mTimed; }
    // Trace time of the first divergence, -1 for none.
    int64_t divergenceUs() const;
    // The call the runs part at; none (index -1) when they part at a timed change.
    const CallRef& firstDivergentCall() const;
    // What each run did there: the call's status and node changes ("0 cpu.big.max=..."), or the
    // node and what moved it (FirstDivergence).
    std::string divergenceA() const;
    std::string divergenceB() const;

    // The trace lines that override the difference of two configurations whose runs do not
    // differ (launch policies prescribing a duration), as "file:line: text".
    void setOverrides(std::vector<std::string> lines) { mOverrides = std::move(lines); }
    const std::vector<std::string>& overrides() const { return mOverrides; }

    const std::string& labelA() const { return mLabelA; }
    const std::string& labelB() const { return mLabelB; }
    const InsightResult& a() const { return mA; }
    const InsightResult& b() const { return mB; }

    // Human-readable report for the terminal: every section below.
    std::string text() const;
    std::string headline() const;
    std::string divergenceText() const;
    std::string nodesText() const;

private:
    // The status and the node changes of the diverging call in `run`.
    std::string whatCallDid(const InsightResult& run, int status) const;

    std::string mLabelA, mLabelB;
    InsightResult mA, mB;
    std::vector<NodeDiff> mNodes;
    int mFirst = -1;
    FirstDivergence mTimed;
    std::vector<std::string> mOverrides;
};

}  // namespace velmora
