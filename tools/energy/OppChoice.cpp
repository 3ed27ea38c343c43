#include "tools/energy/OppChoice.h"

#include <algorithm>

namespace velmora {

namespace {

// 1.25 x 1804800 x 0.4 is 902400 give or take a rounding error: an OPP that equals the request
// in exact arithmetic must still be taken.
constexpr double kSlack = 1e-9;

}  // namespace

OppChoice::Governor OppChoice::governorOf(const std::string& name) {
    if (name == "performance")
        return Governor::kPerformance;
    if (name == "powersave")
        return Governor::kPowersave;
    return Governor::kDynamic;
}

size_t OppChoice::resolve(const EnergyTable& table, const Limits& limits, double u) {
    double target = 1.25 * limits.top * u;
    if (limits.governor == Governor::kPerformance)
        target = limits.cap;
    else if (limits.governor == Governor::kPowersave)
        target = limits.floor;
    const double wanted = std::min(std::max(target, limits.floor), limits.cap);
    const auto& opps = table.opps;
    auto above = std::lower_bound(
        opps.begin(), opps.end(), wanted * (1 - kSlack),
        [](const EnergyOpp& opp, double value) { return static_cast<double>(opp.freq) < value; });
    if (above != opps.end() && above->freq <= limits.cap * (1 + kSlack))
        return static_cast<size_t>(above - opps.begin());
    // Nothing at or above the request within the cap: the highest OPP the cap allows.
    auto below = std::upper_bound(
        opps.begin(), opps.end(), limits.cap * (1 + kSlack),
        [](double value, const EnergyOpp& opp) { return value < static_cast<double>(opp.freq); });
    return below == opps.begin() ? 0 : static_cast<size_t>(below - opps.begin()) - 1;
}

double OppChoice::powerMw(const EnergyTable& table, size_t opp, double top, double u) {
    const EnergyOpp& point = table.opps[opp];
    const double busy = std::min(1.0, u * top / static_cast<double>(point.freq));
    return table.cpus * point.mw * busy;
}

bool OppChoice::saturated(const EnergyTable& table, size_t opp, double top, double u) {
    return u * top > static_cast<double>(table.opps[opp].freq) * (1 + kSlack);
}

}  // namespace velmora
