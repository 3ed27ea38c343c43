// What a configuration change does to the energy and the starved time of each domain: the first
// section of velmora-replay --compare, before where the runs part. Both runs replay one trace,
// so they have the same domains (none when the trace has no load lines). Stateless.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "tools/energy/DomainEnergy.h"

namespace velmora {

class EnergyComparison {
public:
    struct Delta {
        std::string id;
        double aMJ = 0, bMJ = 0;
        int64_t aSaturatedUs = 0, bSaturatedUs = 0;
    };

    // Per domain of `a` (matched by id in `b`, zero where `b` lacks it), in `a`'s order. Inline:
    // the comparison's JSON writer uses it without linking the model.
    static std::vector<Delta> deltas(const std::vector<DomainEnergy>& a,
                                     const std::vector<DomainEnergy>& b) {
        std::vector<Delta> out;
        for (const auto& domain : a) {
            Delta delta{domain.id, domain.mJ, 0, domain.saturatedUs, 0};
            for (const auto& other : b) {
                if (other.id == domain.id) {
                    delta.bMJ = other.mJ;
                    delta.bSaturatedUs = other.saturatedUs;
                }
            }
            out.push_back(delta);
        }
        return out;
    }
    // The terminal section: a line per domain, B - A; one line when there is no estimate.
    static std::string text(const std::vector<DomainEnergy>& a, const std::vector<DomainEnergy>& b);
};

}  // namespace velmora
