#include "tools/energy/LoadTimeline.h"

namespace velmora {

void LoadTimeline::set(int64_t us, const std::string& domain, double u) {
    std::vector<Step>& steps = mSteps[domain];
    // Two lines at one instant: the later one holds; an unchanged load is no step.
    if (!steps.empty() && steps.back().us == us) {
        steps.back().u = u;
        return;
    }
    if (!steps.empty() && steps.back().u == u)
        return;
    steps.push_back({us, u});
}

const std::vector<LoadTimeline::Step>& LoadTimeline::of(const std::string& domain) const {
    static const std::vector<Step> kNone;
    auto it = mSteps.find(domain);
    return it == mSteps.end() ? kNone : it->second;
}

}  // namespace velmora
