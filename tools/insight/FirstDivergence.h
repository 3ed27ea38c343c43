// Where two replays of one trace first leave the device in different states: the earliest trace
// time at which a node holds different values in the two runs, and what made each run's node
// move then. A change made by a call is that call's; a change made between calls is the timer
// that ran out (an action's duration expiring, say) and is told at its own time, not at the call
// that happens to follow it.
#pragma once

#include <cstdint>
#include <string>

#include "tools/insight/InsightResult.h"

namespace velmora {

class FirstDivergence {
public:
    // Compares the value histories of every node present in both runs.
    FirstDivergence(const InsightResult& a, const InsightResult& b);

    // A trace time in milliseconds as the comparison prints it: "2200.000".
    static std::string millis(int64_t us);

    bool found() const { return mUs >= 0; }
    int64_t us() const { return mUs; }
    const std::string& node() const { return mNode; }
    // True when neither run's change at us() was made by a call: a timed change.
    bool timed() const { return mTimed; }
    // What each run's node did at us(): "710400: action 4099 cold_launch expired (applied at
    // t.trace:3 ...)" or "stays 1804800, held by action 4099 cold_launch".
    const std::string& a() const { return mA; }
    const std::string& b() const { return mB; }

private:
    // What `node` of `run` did at `us`; `byCall` is set when a call changed it then.
    static std::string describe(const InsightResult& run, const NodeInsight& node, int64_t us,
                                bool* byCall);

    int64_t mUs = -1;
    std::string mNode;
    bool mTimed = false;
    std::string mA, mB;
};

}  // namespace velmora
