#include "tools/insight/ReportPlot.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <limits>

#include "host/record/Timeline.h"

namespace velmora {

namespace {

// Ten colours that stay apart from each other and from the span shading; past ten, hues a golden
// angle apart.
constexpr const char* kPalette[] = {"#1f77b4", "#d62728", "#2ca02c", "#ff7f0e", "#9467bd",
                                    "#8c564b", "#e377c2", "#17becf", "#7f7f7f", "#bcbd22"};
constexpr size_t kPaletteSize = sizeof(kPalette) / sizeof(kPalette[0]);

std::string number(double v) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%.10g", v);
    return buf;
}

}  // namespace

ReportPlot ReportPlot::fromNodes(const std::string& title, const std::string& unit, double divisor,
                                 const std::vector<std::string>& keys,
                                 const InsightResult& result) {
    ReportPlot plot(title, unit);
    for (const auto& key : keys) {
        const NodeInsight* node = result.node(key);
        if (node == nullptr || !node->numeric)
            continue;
        Series series{key, {}};
        series.steps.reserve(node->segments.size());
        for (const auto& segment : node->segments) {
            double v = 0;
            parseNodeNumber(segment.value, &v);
            series.steps.emplace_back(segment.fromUs, v / divisor);
        }
        plot.add(std::move(series));
    }
    return plot;
}

std::pair<double, double> ReportPlot::valueRange() const {
    double lo = 0, hi = 0;
    for (const auto& series : mSeries) {
        for (const auto& step : series.steps) {
            lo = std::min(lo, step.second);
            hi = std::max(hi, step.second);
        }
    }
    if (hi <= 0 && lo >= 0)
        return {0, 1};  // everything at 0: an axis up to 1 shows it as 0
    // Room above the highest value so its line does not run along the frame.
    const double margin = 0.08 * (hi - lo);
    return {lo < 0 ? lo - margin : 0, hi > 0 ? hi + margin : 0};
}

std::string ReportPlot::colour(size_t index) {
    if (index < kPaletteSize)
        return kPalette[index];
    const double hue = std::fmod(37.0 + 137.508 * static_cast<double>(index - kPaletteSize), 360.0);
    char buf[40];
    snprintf(buf, sizeof(buf), "hsl(%.0f,65%%,42%%)", hue);
    return buf;
}

void ReportPlot::writeRows(std::ostream& out, int64_t endUs) const {
    const size_t count = mSeries.size();
    std::vector<size_t> next(count, 0);
    std::vector<const double*> value(count, nullptr);
    int64_t last = std::numeric_limits<int64_t>::min();
    auto row = [&](int64_t us) {
        out << (last == std::numeric_limits<int64_t>::min() ? "[" : ",") << "["
            << number(static_cast<double>(us) / 1e6);
        for (size_t i = 0; i < count; ++i) {
            out << "," << (value[i] == nullptr ? "null" : number(*value[i]));
        }
        out << "]";
        last = us;
    };
    while (true) {
        int64_t at = std::numeric_limits<int64_t>::max();
        for (size_t i = 0; i < count; ++i) {
            if (next[i] < mSeries[i].steps.size())
                at = std::min(at, mSeries[i].steps[next[i]].first);
        }
        if (at == std::numeric_limits<int64_t>::max() || at >= endUs)
            break;
        // Every series that changes at this time, at the last value it takes then.
        for (size_t i = 0; i < count; ++i) {
            const auto& steps = mSeries[i].steps;
            while (next[i] < steps.size() && steps[next[i]].first == at) {
                value[i] = &steps[next[i]].second;
                ++next[i];
            }
        }
        row(at);
    }
    // Changes at or after the end still count: the node ends the trace at that value.
    for (size_t i = 0; i < count; ++i) {
        if (next[i] < mSeries[i].steps.size())
            value[i] = &mSeries[i].steps.back().second;
    }
    if (last < endUs)
        row(std::max<int64_t>(endUs, 0));
    out << "]";
}

}  // namespace velmora
