// The energy part of the replay's closing text: per domain the energy, the time the load was
// starved, what the limits added to both and where the effective frequency spent its time; then
// who paid for floors. Without load lines in the trace, one line saying there is no estimate.
#pragma once

#include <string>
#include <vector>

#include "tools/energy/DomainEnergy.h"

namespace velmora {

class EnergySummary {
public:
    // How many frequencies per domain, and floor holders per domain, the text shows.
    static constexpr size_t kTopFrequencies = 3;
    static constexpr size_t kTopHolders = 3;

    // `energy` as EnergyModel made it; `traceUs` the trace's length.
    static std::string text(const std::vector<DomainEnergy>& energy, int64_t traceUs);
};

}  // namespace velmora
