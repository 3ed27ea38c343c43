#include "tools/energy/EnergyPlots.h"

namespace velmora {

double EnergyPlots::toMhz(const std::string& unit) {
    if (unit == "kHz")
        return 1e3;
    if (unit == "Hz")
        return 1e6;
    return 1;  // MHz, or a unit the profile does not say: shown as written
}

std::vector<ReportPlot> EnergyPlots::plots(const std::vector<DomainEnergy>& energy) {
    std::vector<ReportPlot> out;
    for (const auto& domain : energy) {
        const double divisor = toMhz(domain.unit);
        ReportPlot::Series effective{"effective frequency", {}};
        ReportPlot::Series needed{"needed by the load", {}};
        ReportPlot::Series power{"power", {}};
        ReportPlot::Series unlimited{"power without limits", {}};
        for (const auto& point : domain.series) {
            effective.steps.emplace_back(point.us, static_cast<double>(point.freq) / divisor);
            needed.steps.emplace_back(point.us, point.neededFreq / divisor);
            power.steps.emplace_back(point.us, point.mw);
            unlimited.steps.emplace_back(point.us, point.unlimitedMw);
        }
        ReportPlot frequency(domain.id + ": effective frequency (energy model)",
                             divisor == 1 ? domain.unit : "MHz");
        frequency.add(std::move(effective));
        frequency.add(std::move(needed));
        out.push_back(std::move(frequency));
        ReportPlot watts(domain.id + ": power (energy model)", "mW");
        watts.add(std::move(power));
        watts.add(std::move(unlimited));
        out.push_back(std::move(watts));
    }
    return out;
}

}  // namespace velmora
