// The report's plots as the page's script receives them: node values in the plot's unit, the
// rows of a plot with every series carrying its value to the end of the trace, a value axis that
// shows a constant node at its value, and colours that never repeat within a plot.
#include <gtest/gtest.h>

#include <set>
#include <sstream>
#include <string>

#include "tools/insight/HtmlReport.h"
#include "tools/insight/ReportPlot.h"

namespace velmora {
namespace {

NodeInsight node(const std::string& key, std::vector<std::pair<int64_t, std::string>> values) {
    NodeInsight out;
    out.key = key;
    for (const auto& value : values)
        out.segments.push_back({value.first, value.second, "initial", -1});
    return out;
}

std::string rows(const ReportPlot& plot, int64_t endUs) {
    std::ostringstream out;
    plot.writeRows(out, endUs);
    return out.str();
}

TEST(ReportPlotTest, ShowsNodesInThePlotsUnitAndCarriesValuesToTheEnd) {
    InsightResult result;
    result.endUs = 3000000;
    result.nodes = {node("cpu.big.min", {{0, "710400"}, {1000000, "1804800"}}),
                    node("cpu.big.max", {{0, "2841600"}, {2500000, "1497600"}})};
    result.nodes.push_back(node("cpu.big.governor", {{0, "schedutil"}}));
    result.nodes.back().numeric = false;
    const ReportPlot plot = ReportPlot::fromNodes(
        "CPU big cluster", "MHz", 1e3, {"cpu.big.min", "cpu.big.max", "cpu.big.governor"}, result);
    ASSERT_EQ(2u, plot.series().size());  // not the governor: it has no numbers
    EXPECT_EQ("[[0,710.4,2841.6],[1,1804.8,2841.6],[2.5,1804.8,1497.6],[3,1804.8,1497.6]]",
              rows(plot, result.endUs));
}

struct RowsRow {
    const char* what;
    std::vector<std::pair<int64_t, double>> steps;
    int64_t endUs;
    const char* rows;
};

void PrintTo(const RowsRow& row, std::ostream* os) {
    *os << row.what;
}

class ReportRowsTest : public testing::TestWithParam<RowsRow> {};

TEST_P(ReportRowsTest, WritesOneRowPerInstant) {
    const RowsRow& row = GetParam();
    ReportPlot plot("p", "level");
    plot.add({"a", row.steps});
    EXPECT_EQ(row.rows, rows(plot, row.endUs)) << row.what;
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ReportRowsTest,
    testing::Values(
        RowsRow{"several changes in one instant: the last",
                {{0, 1}, {500000, 2}, {500000, 3}},
                1000000,
                "[[0,1],[0.5,3],[1,3]]"},
        RowsRow{"a change at the end", {{0, 1}, {1000000, 4}}, 1000000, "[[0,1],[1,4]]"},
        RowsRow{"a change after the end", {{0, 1}, {2000000, 4}}, 1000000, "[[0,1],[1,4]]"},
        RowsRow{"an empty trace", {{0, 7}}, 0, "[[0,7]]"}),
    [](const testing::TestParamInfo<RowsRow>& info) { return std::to_string(info.index); });

struct RangeRow {
    const char* what;
    std::vector<double> values;
    double lo, hi;
};

void PrintTo(const RangeRow& row, std::ostream* os) {
    *os << row.what;
}

class ReportRangeTest : public testing::TestWithParam<RangeRow> {};

TEST_P(ReportRangeTest, OpensWithAnHonestValueAxis) {
    const RangeRow& row = GetParam();
    ReportPlot plot("p", "MHz");
    ReportPlot::Series series{"s", {}};
    for (size_t i = 0; i < row.values.size(); ++i)
        series.steps.emplace_back(static_cast<int64_t>(i) * 1000, row.values[i]);
    plot.add(series);
    const auto range = plot.valueRange();
    EXPECT_DOUBLE_EQ(row.lo, range.first) << row.what;
    EXPECT_DOUBLE_EQ(row.hi, range.second) << row.what;
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ReportRangeTest,
    testing::Values(RangeRow{"a constant node sits at its value", {200}, 0, 216},
                    RangeRow{"a node that moves", {710.4, 2841.6}, 0, 3068.928},
                    RangeRow{"all at zero", {0, 0}, 0, 1},
                    RangeRow{"negative levels", {-20, 10}, -22.4, 12.4}),
    [](const testing::TestParamInfo<RangeRow>& info) { return std::to_string(info.index); });

TEST(ReportPlotTest, NoColourTwiceInAPlot) {
    std::set<std::string> seen;
    for (size_t i = 0; i < 24; ++i)
        EXPECT_TRUE(seen.insert(ReportPlot::colour(i)).second) << "colour " << i;
}

// A caller's own plot (energy per domain, say) is drawn after the node groups, with its unit.
TEST(ReportPlotTest, TheReportDrawsAddedPlotsInline) {
    InsightResult result;
    result.endUs = 2000000;
    result.nodes = {node("gpu.max", {{0, "600000000"}})};
    std::vector<ReportPlot> plots = HtmlReport::plots(result);
    ASSERT_EQ(1u, plots.size());
    EXPECT_EQ("MHz", plots[0].unit());
    ReportPlot added("Energy", "mJ");
    added.add({"cpu", {{0, 1.5}}});
    plots.push_back(added);
    std::ostringstream out;
    HtmlReport::write(result, plots, out);
    const std::string html = out.str();
    EXPECT_NE(std::string::npos, html.find("<h3>Energy (mJ)</h3>"));
    EXPECT_NE(std::string::npos, html.find("velmoraReport.plot(1,{unit:\"mJ\",labels:[\"cpu\"]"));
    EXPECT_NE(std::string::npos, html.find("[[0,600],[2,600]]"));
    // Everything inline: nothing is fetched (the plotting library's one image is a data URL).
    EXPECT_EQ(std::string::npos, html.find("src=\"http"));
    EXPECT_EQ(std::string::npos, html.find("src=\"//"));
    EXPECT_EQ(std::string::npos, html.find("<link"));
}

}  // namespace
}  // namespace velmora
