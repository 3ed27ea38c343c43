// The energy model's plots of the replay report: per domain its effective frequency against
// what the load needs (the gap is the starved time), and its power against the power without
// limits (the gap is what the floors cost or the caps saved). Added after the node plots.
#pragma once

#include <string>
#include <vector>

#include "tools/energy/DomainEnergy.h"
#include "tools/insight/ReportPlot.h"

namespace velmora {

class EnergyPlots {
public:
    // Two plots per domain, in the order of `energy`; none without load lines.
    static std::vector<ReportPlot> plots(const std::vector<DomainEnergy>& energy);
    // What turns a frequency of `unit` into MHz: 1000 for kHz, 1e6 for Hz.
    static double toMhz(const std::string& unit);
};

}  // namespace velmora
