// The load of each performance domain over a replay, as the trace's `load` lines set it: a
// domain's load holds from the line's time until the next line naming it, and is 0 until the
// first. Recorded by the replay as it reads the lines (a few bytes per domain and line);
// read by EnergyModel at the end. Not thread safe: the replay thread alone uses it.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace velmora {

class LoadTimeline {
public:
    struct Step {
        int64_t us = 0;
        double u = 0;
    };

    // Domain `domain` has load `u` from trace time `us` on; `us` never goes back.
    void set(int64_t us, const std::string& domain, double u);
    // Whether any load line was recorded.
    bool empty() const { return mSteps.empty(); }
    // The steps of `domain` in time order; empty when no line named it.
    const std::vector<Step>& of(const std::string& domain) const;

private:
    std::map<std::string, std::vector<Step>> mSteps;
};

}  // namespace velmora
