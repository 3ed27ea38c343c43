// What the energy model found for one performance domain over a replay: the energy its CPUs
// drew, how long the load needed more than the domain gave, what the frequency limits added to
// both, where the effective frequency spent its time, and the effective frequency and power
// over time for the report's plots. Plain data, made by EnergyModel; read by the summary, the
// JSON writer, the HTML report and the comparison.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace velmora {

// The effective frequency and power of a domain from `us` on, until the next point.
struct EnergyPoint {
    int64_t us = 0;
    long long freq = 0;     // the effective OPP
    double neededFreq = 0;  // u x top: what the load needs; above `freq` while starved
    double mw = 0;
    double unlimitedMw = 0;  // the power with no floor and no cap
};

struct DomainEnergy {
    std::string id;           // the <frequencies> id, e.g. "cpu.big"
    std::string unit;         // of its frequencies, e.g. "kHz"
    double mJ = 0;            // energy from 0 to the end of the trace
    int64_t saturatedUs = 0;  // time the load needed more than the effective frequency gave
    // Energy and saturated time with every floor at the lowest OPP and every cap at the top
    // one, subtracted from the above: positive where floors cost energy or caps starved the
    // load, negative where caps saved energy.
    double limitsMJ = 0;
    int64_t limitsSaturatedUs = 0;
    // Time at each effective frequency (ascending; frequencies never used are left out).
    std::vector<std::pair<long long, int64_t>> residencyUs;
    // Per holder of the floor: the energy spent above the run without floors while it held the
    // floor (holders whose floor cost nothing are left out), most first.
    std::vector<std::pair<std::string, double>> floorHoldersMJ;
    std::vector<EnergyPoint> series;  // from 0 on, a point per change
};

}  // namespace velmora
