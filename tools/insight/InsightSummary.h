// The replay's closing text: one line per node with its initial and final value, the number of
// changes, the range it covered and who holds the final value; then where the nodes that moved
// spent most time, and the warnings about what was left applied. The node table is the same for
// a real-time and a virtual-time replay of a trace; the times at each value may differ by the
// real-time replay's lateness.
#pragma once

#include <string>

#include "tools/insight/InsightResult.h"

namespace velmora {

class InsightSummary {
public:
    // How many values per node the residency column shows.
    static constexpr size_t kTopValues = 3;

    static std::string table(const InsightResult& result);
    static std::string residency(const InsightResult& result);
    static std::string warnings(const InsightResult& result);
    // "1804800 62.5%, 2841600 37.5%": the top values of `node` with their share of the trace.
    static std::string topResidency(const NodeInsight& node, int64_t traceUs, size_t count);
    // A node's numeric value as the tables print it (up to 10 significant digits).
    static std::string number(double v);
};

}  // namespace velmora
