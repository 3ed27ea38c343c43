// The operating point a performance domain runs at, given its limits, its governor and its
// load, the way the kernel picks it:
//
// - a dynamic governor (schedutil, simple_ondemand, anything but the two below) asks for
//   1.25 x top x u, schedutil's get_next_freq: enough headroom that a load of 80 % of the
//   capacity at a frequency is served by it;
// - performance asks for the cap, powersave for the floor;
// - the request is clamped to [floor, cap], the cap winning when a floor lies above it (as
//   the kernel's policy limits do), and resolved to the lowest OPP at or above it (the
//   drivers' CPUFREQ_RELATION_L); when there is none, the highest OPP at or below the cap.
//
// Then the domain's CPUs are busy u x top / f of the time (at most all of it), each drawing the
// OPP's power while busy, and the load is starved (saturated) while u x top > f. Stateless.
#pragma once

#include <string>

#include "host/device/profile/EnergyTable.h"

namespace velmora {

class OppChoice {
public:
    enum class Governor { kDynamic, kPerformance, kPowersave };

    struct Limits {
        double floor = 0;
        double cap = 0;
        double top = 0;  // the domain's top frequency (cpuinfo_max_freq): the capacity of u = 1
        Governor governor = Governor::kDynamic;
    };

    static Governor governorOf(const std::string& name);
    // Index in `table.opps` (not empty) of the OPP the domain runs at under `limits` and load
    // `u`.
    static size_t resolve(const EnergyTable& table, const Limits& limits, double u);
    // Power (mW) of the whole domain at OPP `opp` under load `u`.
    static double powerMw(const EnergyTable& table, size_t opp, double top, double u);
    // Whether load `u` needs more than OPP `opp` gives.
    static bool saturated(const EnergyTable& table, size_t opp, double top, double u);
};

}  // namespace velmora
