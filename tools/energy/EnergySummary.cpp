#include "tools/energy/EnergySummary.h"

#include <algorithm>
#include <cstdio>

namespace velmora {

namespace {

std::string topFrequencies(const DomainEnergy& domain, int64_t traceUs) {
    std::vector<std::pair<long long, int64_t>> byTime = domain.residencyUs;
    std::stable_sort(byTime.begin(), byTime.end(),
                     [](const auto& a, const auto& b) { return a.second > b.second; });
    std::string out;
    for (size_t i = 0; i < byTime.size() && i < EnergySummary::kTopFrequencies; ++i) {
        char entry[64];
        snprintf(entry, sizeof(entry), "%s%lld %.1f%%", i == 0 ? "" : ", ", byTime[i].first,
                 traceUs > 0 ? 100.0 * byTime[i].second / traceUs : 0.0);
        out += entry;
    }
    return out.empty() ? "-" : out;
}

}  // namespace

std::string EnergySummary::text(const std::vector<DomainEnergy>& energy, int64_t traceUs) {
    if (energy.empty())
        return "no load in the trace: no energy estimate\n";
    std::string out =
        "energy estimate (energy tables x the trace's load; limits: what floors and caps "
        "changed)\n";
    char line[512];
    snprintf(line, sizeof(line), "%-14s %12s %12s %12s %12s  %s\n", "domain", "mJ", "saturated ms",
             "limits mJ", "limits sat ms", "effective frequency (most time)");
    out += line;
    for (const auto& domain : energy) {
        snprintf(line, sizeof(line), "%-14s %12.1f %12.1f %+12.1f %+12.1f  %s\n", domain.id.c_str(),
                 domain.mJ, domain.saturatedUs / 1000.0, domain.limitsMJ,
                 domain.limitsSaturatedUs / 1000.0, topFrequencies(domain, traceUs).c_str());
        out += line;
    }
    bool header = false;
    for (const auto& domain : energy) {
        if (domain.floorHoldersMJ.empty())
            continue;
        if (!header)
            out += "energy above the run without floors, by floor holder\n";
        header = true;
        std::string holders;
        for (size_t i = 0; i < domain.floorHoldersMJ.size() && i < kTopHolders; ++i) {
            char entry[256];
            snprintf(entry, sizeof(entry), "%s%s (%.1f mJ)", i == 0 ? "" : ", ",
                     domain.floorHoldersMJ[i].first.c_str(), domain.floorHoldersMJ[i].second);
            holders += entry;
        }
        snprintf(line, sizeof(line), "%-14s %s\n", domain.id.c_str(), holders.c_str());
        out += line;
    }
    return out;
}

}  // namespace velmora
