// The energy table of one performance domain, as a device profile gives it: for each operating
// point (OPP) of the domain, the power of one of its CPUs running flat out at that frequency.
// The kernel's Energy Model holds the same per-OPP power of each performance domain for
// energy-aware scheduling; a vendor's power profile has it as its per-cluster core speeds and
// core powers.
//
//     <energy id="cpu.little" cpus="4">
//         <opp freq="300000" mw="6"/>
//         ...
//     </energy>
//
// Plain data, read by EnergyTableReader; the replay's energy model reads it.
#pragma once

#include <string>
#include <vector>

namespace velmora {

struct EnergyOpp {
    long long freq = 0;  // in the unit of the domain's <frequencies>
    double mw = 0;       // one CPU of the domain, fully busy at `freq`
};

struct EnergyTable {
    std::string id;               // the <frequencies> id of the domain, e.g. "cpu.big" or "gpu"
    int cpus = 1;                 // CPUs of the domain (1 for a devfreq device such as the GPU)
    std::vector<EnergyOpp> opps;  // one per available frequency, ascending
    int line = 0;                 // line of <energy> in its profile
};

}  // namespace velmora
