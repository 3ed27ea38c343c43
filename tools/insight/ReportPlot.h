// One plot of the replay report: a set of step series over trace time that share a unit. The
// report draws each plot with its own value axis, its own colours (no colour twice in a plot) and
// the scene, on/off and action spans shaded behind.
//
// A node's values are kept as the node writes them (kHz, Hz, millidegrees) and shown in the
// plot's unit: `divisor` turns one into the other (kHz / 1000 = MHz). Other kinds of series (an
// energy or power estimate per domain) are added as steps of their own.
#pragma once

#include <cstdint>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include "tools/insight/InsightResult.h"

namespace velmora {

class ReportPlot {
public:
    struct Series {
        std::string name;
        // (trace time, value in the plot's unit) at each change, times ascending; the value
        // holds until the next change and the last one until the end of the trace.
        std::vector<std::pair<int64_t, double>> steps;
    };

    ReportPlot(std::string title, std::string unit)
        : mTitle(std::move(title)), mUnit(std::move(unit)) {}

    // The numeric nodes of `keys` found in `result`, their values divided by `divisor`.
    static ReportPlot fromNodes(const std::string& title, const std::string& unit, double divisor,
                                const std::vector<std::string>& keys, const InsightResult& result);

    void add(Series series) { mSeries.push_back(std::move(series)); }

    const std::string& title() const { return mTitle; }
    const std::string& unit() const { return mUnit; }
    const std::vector<Series>& series() const { return mSeries; }
    bool empty() const { return mSeries.empty(); }

    // The value axis the plot opens with: from 0 (or the lowest value, when negative) to a little
    // above the highest, so that a node that never moves sits at its value with the axis showing
    // it, not in the middle of a made-up range around it.
    std::pair<double, double> valueRange() const;

    // The series' colours: distinct within the plot, however many series it has.
    static std::string colour(size_t index);

    // The plot's rows as a JSON array, [[seconds, value of series 0, value of series 1, ...]]:
    // one row per time at which any series changes (the others carry their value), and a last
    // row at `endUs` so every step reaches the end of the trace. Written as it goes: the rows of
    // a long replay are never one string.
    void writeRows(std::ostream& out, int64_t endUs) const;

private:
    std::string mTitle;
    std::string mUnit;
    std::vector<Series> mSeries;
};

}  // namespace velmora
