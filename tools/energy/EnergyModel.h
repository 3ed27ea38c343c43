// The energy and the starved time of each performance domain over a replay, from what the
// simulated device held and what the trace says the load was.
//
// At every instant a domain's effective frequency follows from the values of its nodes
// (<id>.min, <id>.max, <id>.top, <id>.governor) and its load (OppChoice); its power is the
// OPP's power times the busy share of its CPUs. Between two changes of a node of the domain or
// of its load nothing moves, so the model walks the node segments the analysis recorded and the
// load steps once, integrating piecewise-constant pieces: the replay pays nothing per call.
// Each piece is also taken without limits (every floor at the lowest OPP, every cap at the top
// one) and without floors, for the limits' share and the floor holders' cost.
//
// A domain without a node falls back to its table: floor the lowest OPP, cap and top the highest
// OPP, a dynamic governor. Stateless.
#pragma once

#include <vector>

#include "tools/energy/DomainEnergy.h"
#include "tools/energy/LoadTimeline.h"
#include "tools/insight/InsightResult.h"

namespace velmora {

class DeviceProfile;
struct EnergyTable;

class EnergyModel {
public:
    // One entry per domain with an energy table, in profile order, from 0 to result.endUs;
    // empty when the trace had no load line.
    static std::vector<DomainEnergy> run(const DeviceProfile& profile, const InsightResult& result,
                                         const LoadTimeline& loads);

    // One domain; the nodes are looked up in `result` by `table.id` + ".min" and so on.
    static DomainEnergy runDomain(const EnergyTable& table, const InsightResult& result,
                                  const std::vector<LoadTimeline::Step>& loads);
};

}  // namespace velmora
