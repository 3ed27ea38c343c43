// The offline report of one replay: a single HTML file with everything inline (no network, no
// external scripts or fonts), so it opens on machines without access to the outside world.
// Interactive step plots of the node groups over the trace (ReportPlot: a series set with a unit;
// drawn by the inlined dygraphs library, see ReportScripts.h) with scene, on/off and action spans
// shaded, residency bars, who holds each final value, and the warnings.
//
// The page's script measures the plots once the page is laid out and leaves the figures in the
// body's data-plots attribute, for the browser check of the test suite.
#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "tools/insight/InsightResult.h"
#include "tools/insight/ReportPlot.h"

namespace velmora {

class HtmlReport {
public:
    struct Group {
        std::string title;
        std::string unit;  // shown on the value axis and after each value
        double divisor;    // node value / divisor = value in `unit`
        std::vector<std::string> keys;
    };
    // The plotted node groups, in page order; nodes missing from a result are left out.
    static const std::vector<Group>& groups();
    // The plots of groups() for `result`, empty ones left out. A caller adds plots of its own
    // after these and hands the whole list to write().
    static std::vector<ReportPlot> plots(const InsightResult& result);

    static std::string html(const InsightResult& result);
    // Writes the report to `out` as it is made, and to `path` (false with `error` set when the
    // file cannot be written): the plots of a long replay are never one string. Without `plots`,
    // those of plots(result).
    static void write(const InsightResult& result, const std::vector<ReportPlot>& plots,
                      std::ostream& out);
    static void write(const InsightResult& result, std::ostream& out);
    static bool write(const InsightResult& result, const std::vector<ReportPlot>& plots,
                      const std::string& path, std::string* error);
    static bool write(const InsightResult& result, const std::string& path, std::string* error);
};

}  // namespace velmora
