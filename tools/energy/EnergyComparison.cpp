#include "tools/energy/EnergyComparison.h"

#include <cstdio>

namespace velmora {

std::string EnergyComparison::text(const std::vector<DomainEnergy>& a,
                                   const std::vector<DomainEnergy>& b) {
    if (a.empty() && b.empty())
        return "no load in the trace: no energy estimate\n";
    std::string out = "energy and starved time per domain, A -> B\n";
    char line[256];
    snprintf(line, sizeof(line), "%-14s %12s %12s %12s %14s %14s %14s\n", "domain", "mJ A", "mJ B",
             "delta mJ", "saturated ms A", "saturated ms B", "delta ms");
    out += line;
    for (const auto& d : deltas(a, b)) {
        const double change = d.aMJ != 0 ? 100.0 * (d.bMJ - d.aMJ) / d.aMJ : 0.0;
        char percent[32] = "";
        if (d.aMJ != 0)
            snprintf(percent, sizeof(percent), " (%+.1f%%)", change);
        snprintf(line, sizeof(line), "%-14s %12.1f %12.1f %+12.1f %14.1f %14.1f %+14.1f%s\n",
                 d.id.c_str(), d.aMJ, d.bMJ, d.bMJ - d.aMJ, d.aSaturatedUs / 1000.0,
                 d.bSaturatedUs / 1000.0, (d.bSaturatedUs - d.aSaturatedUs) / 1000.0, percent);
        out += line;
    }
    return out;
}

}  // namespace velmora
