#include "tools/energy/EnergyModel.h"

#include <algorithm>
#include <climits>
#include <map>

#include "host/device/profile/DeviceProfile.h"
#include "host/record/Timeline.h"
#include "tools/energy/OppChoice.h"

namespace velmora {

namespace {

// Walks the segments of one node in time order.
class SegmentCursor {
public:
    explicit SegmentCursor(const NodeInsight* node) : mNode(node) {}

    int64_t nextUs() const {
        return mNode != nullptr && mNext < mNode->segments.size() ? mNode->segments[mNext].fromUs
                                                                  : INT64_MAX;
    }
    // The segment that begins at or before `us` last, or null when none does anew.
    const HolderSegment* advance(int64_t us) {
        const HolderSegment* last = nullptr;
        while (nextUs() <= us)
            last = &mNode->segments[mNext++];
        return last;
    }

private:
    const NodeInsight* mNode;
    size_t mNext = 0;
};

void takeNumber(const HolderSegment* segment, double* value) {
    double v = 0;
    if (segment != nullptr && parseNodeNumber(segment->value, &v))
        *value = v;
}

double mJ(double mw, int64_t us) {
    return mw * static_cast<double>(us) / 1e6;
}

}  // namespace

std::vector<DomainEnergy> EnergyModel::run(const DeviceProfile& profile,
                                           const InsightResult& result, const LoadTimeline& loads) {
    std::vector<DomainEnergy> out;
    if (loads.empty())
        return out;
    for (const auto& table : profile.energyTables()) {
        out.push_back(runDomain(table, result, loads.of(table.id)));
        const NodeSpec* floor = profile.find(table.id + ".min");
        const NodeSpec* cap = profile.find(table.id + ".max");
        out.back().unit = floor != nullptr ? floor->rule.unit
                          : cap != nullptr ? cap->rule.unit
                                           : "";
    }
    return out;
}

DomainEnergy EnergyModel::runDomain(const EnergyTable& table, const InsightResult& result,
                                    const std::vector<LoadTimeline::Step>& loads) {
    DomainEnergy out;
    out.id = table.id;
    if (table.opps.empty())
        return out;
    const double lowest = static_cast<double>(table.opps.front().freq);
    const double highest = static_cast<double>(table.opps.back().freq);
    SegmentCursor floorNode(result.node(table.id + ".min"));
    SegmentCursor capNode(result.node(table.id + ".max"));
    SegmentCursor topNode(result.node(table.id + ".top"));
    SegmentCursor governorNode(result.node(table.id + ".governor"));
    OppChoice::Limits limits{lowest, highest, highest, OppChoice::Governor::kDynamic};
    std::string floorHolder = "initial";
    double u = 0;
    size_t load = 0;
    double freeMJ = 0;  // without limits
    int64_t freeSaturatedUs = 0;
    std::vector<int64_t> residency(table.opps.size(), 0);
    std::map<std::string, double> holders;
    const int64_t end = result.endUs;
    for (int64_t t = 0; t < end;) {
        if (const HolderSegment* s = floorNode.advance(t)) {
            takeNumber(s, &limits.floor);
            floorHolder = s->heldBy;
        }
        takeNumber(capNode.advance(t), &limits.cap);
        takeNumber(topNode.advance(t), &limits.top);
        if (const HolderSegment* s = governorNode.advance(t))
            limits.governor = OppChoice::governorOf(s->value);
        for (; load < loads.size() && loads[load].us <= t; ++load)
            u = loads[load].u;
        int64_t next = std::min(
            {end, floorNode.nextUs(), capNode.nextUs(), topNode.nextUs(), governorNode.nextUs()});
        if (load < loads.size())
            next = std::min(next, loads[load].us);
        const int64_t dt = next - t;

        const size_t opp = OppChoice::resolve(table, limits, u);
        const double mw = OppChoice::powerMw(table, opp, limits.top, u);
        out.mJ += mJ(mw, dt);
        if (OppChoice::saturated(table, opp, limits.top, u))
            out.saturatedUs += dt;
        residency[opp] += dt;

        const OppChoice::Limits unlimited{lowest, highest, limits.top, limits.governor};
        const size_t freeOpp = OppChoice::resolve(table, unlimited, u);
        const double freeMw = OppChoice::powerMw(table, freeOpp, limits.top, u);
        freeMJ += mJ(freeMw, dt);
        if (OppChoice::saturated(table, freeOpp, limits.top, u))
            freeSaturatedUs += dt;
        const EnergyPoint point{t, table.opps[opp].freq, u * limits.top, mw, freeMw};
        if (out.series.empty() || out.series.back().freq != point.freq ||
            out.series.back().neededFreq != point.neededFreq || out.series.back().mw != mw ||
            out.series.back().unlimitedMw != freeMw)
            out.series.push_back(point);

        if (floorHolder != "initial" && limits.floor > lowest) {
            const OppChoice::Limits floorless{lowest, limits.cap, limits.top, limits.governor};
            const size_t floorlessOpp = OppChoice::resolve(table, floorless, u);
            const double extra = mw - OppChoice::powerMw(table, floorlessOpp, limits.top, u);
            if (extra > 0)
                holders[floorHolder] += mJ(extra, dt);
        }
        t = next;
    }
    out.limitsMJ = out.mJ - freeMJ;
    out.limitsSaturatedUs = out.saturatedUs - freeSaturatedUs;
    for (size_t i = 0; i < residency.size(); ++i) {
        if (residency[i] > 0)
            out.residencyUs.emplace_back(table.opps[i].freq, residency[i]);
    }
    out.floorHoldersMJ.assign(holders.begin(), holders.end());
    std::stable_sort(out.floorHoldersMJ.begin(), out.floorHoldersMJ.end(),
                     [](const auto& a, const auto& b) { return a.second > b.second; });
    return out;
}

}  // namespace velmora
