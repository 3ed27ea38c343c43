#include "tools/insight/InsightSummary.h"

#include <cstdio>
#include <cstdlib>

#include "host/record/Timeline.h"

namespace velmora {

std::string InsightSummary::number(double v) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%.10g", v);
    return buf;
}

std::string InsightSummary::topResidency(const NodeInsight& node, int64_t traceUs, size_t count) {
    std::string out;
    for (size_t i = 0; i < node.residencyUs.size() && i < count; ++i) {
        char share[32];
        snprintf(share, sizeof(share), "%.1f%%",
                 traceUs > 0 ? 100.0 * node.residencyUs[i].second / traceUs : 0.0);
        out += (i == 0 ? "" : ", ") + node.residencyUs[i].first + " " + share;
    }
    return out.empty() ? "-" : out;
}

std::string InsightSummary::table(const InsightResult& result) {
    std::string out;
    char line[1024];
    snprintf(line, sizeof(line), "%-30s %14s %14s %8s %14s %14s  %s\n", "node", "initial", "final",
             "changes", "min", "max", "held by");
    out += line;
    for (const auto& node : result.nodes) {
        double lo = 0, hi = 0;
        bool first = true;
        for (const auto& segment : node.segments) {
            double v = 0;
            if (!node.numeric || !parseNodeNumber(segment.value, &v))
                continue;
            lo = first || v < lo ? v : lo;
            hi = first || v > hi ? v : hi;
            first = false;
        }
        snprintf(line, sizeof(line), "%-30s %14s %14s %8d %14s %14s  %s\n", node.key.c_str(),
                 node.initial.c_str(), node.final.c_str(), node.changes,
                 node.numeric ? number(lo).c_str() : "-", node.numeric ? number(hi).c_str() : "-",
                 node.heldBy.c_str());
        out += line;
    }
    return out;
}

std::string InsightSummary::residency(const InsightResult& result) {
    std::string out = "time at value (share of the trace, the " + std::to_string(kTopValues) +
                      " values with most time)\n";
    char line[512];
    for (const auto& node : result.nodes) {
        if (node.residencyUs.size() < 2)
            continue;  // never moved (or not numeric): nothing to tell
        snprintf(line, sizeof(line), "%-30s %s\n", node.key.c_str(),
                 topResidency(node, result.endUs, kTopValues).c_str());
        out += line;
    }
    return out;
}

std::string InsightSummary::warnings(const InsightResult& result) {
    if (result.warnings.empty())
        return "nothing was left applied\n";
    std::string out;
    for (const auto& warning : result.warnings) {
        out += "warning: " + warning.message + "\n";
    }
    return out;
}

}  // namespace velmora
