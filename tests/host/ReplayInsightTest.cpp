// The replay's analysis end to end: small traces replayed in virtual time through the server on
// the host layer, checking who holds each value, the time at each value, the warnings about what
// stayed applied, the comparison of two configurations and the timeline's slices.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cmath>
#include <map>
#include <nlohmann/json.hpp>
#include <set>
#include <string>
#include <vector>

#include "host/platform/HostEnvironment.h"
#include "tests/host/HostTestSupport.h"
#include "tools/insight/ReplayInsight.h"
#include "tools/replay/ComparisonRun.h"
#include "tools/replay/ReplaySession.h"

namespace velmora {
namespace {

// The analysis tests' configuration: a launch, a probe, scenes and an on/off command.
const char* const kConfig = hosttest::kAnalysisConfig;

struct Replayed {
    std::string dir;
    InsightResult insight;
};

// Replays `trace` under kConfig in a scratch directory, with every output written there.
Replayed replay(const std::string& name, const std::string& trace) {
    Replayed run;
    run.dir = hosttest::configDir(name, kConfig);
    hosttest::writeFile(run.dir + "/t.trace", trace);
    ReplayOptions options = hosttest::replayOptions(run.dir, run.dir + "/t.trace");
    options.summaryJsonPath = run.dir + "/summary.json";
    FILE* out = fopen((run.dir + "/stdout.txt").c_str(), "w");
    ReplaySession session(options, out, stderr);
    EXPECT_EQ(ReplaySession::kOk, session.run()) << trace;
    run.insight = session.insight();
    fclose(out);
    return run;
}

struct HolderRow {
    const char* what;
    const char* trace;
    const char* key;
    int64_t atMs;
    const char* holder;
};

class HolderTest : public testing::TestWithParam<HolderRow> {};

TEST_P(HolderTest, NamesTheWinningRequest) {
    const HolderRow& row = GetParam();
    const Replayed run = replay("holder", row.trace);
    EXPECT_EQ(row.holder, ReplayInsight::holderAt(run.insight, row.key, row.atMs * 1000))
        << row.what;
}

const char* kClientCaps =
    "@0 setconfig 1 5=2016000\n@100 setconfig 3 5=1804800\n@200 setconfig 3 5=0\n@300\n";
const char* kSceneOverAction = "@0 event 4099 0\n@500 event 4119 0\n@3000\n";

INSTANTIATE_TEST_SUITE_P(
    Rows, HolderTest,
    testing::Values(HolderRow{"one client's cap", kClientCaps, "cpu.big.max", 50, "KX"},
                    HolderRow{"a lower cap of another client wins", kClientCaps, "cpu.big.max", 150,
                              "ZOLA"},
                    HolderRow{"a timed action's floor", kSceneOverAction, "cpu.big.min", 100,
                              "action 4099 cold_launch"},
                    HolderRow{"a scene's higher floor replaces it", kSceneOverAction, "cpu.big.min",
                              1000, "scene 4119 game"},
                    HolderRow{"an on/off command", "@0 event 12300 0\n@10\n", "cpu.little.min", 5,
                              "onoff 12300 touch_floor"}));

TEST(ReplayInsightTest, ResidencyFollowsTheLimitsToTheTraceEnd) {
    const Replayed run = replay("residency", kSceneOverAction);
    // 500 ms at the launch floor, then the game's floor to the end at 3000 ms.
    const NodeInsight* bigMin = run.insight.node("cpu.big.min");
    ASSERT_NE(nullptr, bigMin);
    const std::vector<std::pair<std::string, int64_t>> expected = {{"2419200", 2500000},
                                                                   {"1804800", 500000}};
    EXPECT_EQ(expected, bigMin->residencyUs);
}

TEST(ReplayInsightTest, WarnsAboutEverythingLeftAppliedNamingTheCall) {
    const Replayed run = replay("stuck",
                                "@0 event 4118 0\n"                          // scene, never off
                                "@100 event 4119 0\n@200 event 4230 0\n"     // governor scene under
                                "@300 event 4230 -1\n"                       // 4119, switched off
                                "@400 event 12300 0\n"                       // on/off left on
                                "@500 setconfig 2 2=1401600\n"               // client cap
                                "@600 event 4116 0 msg=\"pid=77|tid=78\"\n"  // boost at 608 ms
                                "@650\n");
    std::map<std::string, std::string> byKind;
    for (const auto& warning : run.insight.warnings)
        byKind[warning.kind] = warning.message;
    EXPECT_NE(std::string::npos, byKind["scene"].find("4119 game")) << byKind["scene"];
    EXPECT_NE(std::string::npos, byKind["governor_scene"].find("t.trace:3"))
        << byKind["governor_scene"];
    EXPECT_NE(std::string::npos, byKind["onoff"].find("12300 touch_floor was left on"));
    EXPECT_NE(std::string::npos, byKind["client_limit"].find("JN never released cpu.little.max"));
    EXPECT_NE(std::string::npos, byKind["probe_boost"].find("thread 78"));
    EXPECT_NE(std::string::npos, byKind["probe_boost"].find("t.trace:7"));
    // Scene 4118 was withdrawn when 4119 took over: no warning for it.
    for (const auto& warning : run.insight.warnings)
        EXPECT_EQ(std::string::npos, warning.message.find("4118")) << warning.message;
}

TEST(ReplayInsightTest, TimelineSlicesSitOnNamedTracks) {
    const Replayed run = replay("slices",
                                "@0 event 4119 0\n@100 event 4099 0\n@200 event 4099 0\n"
                                "@300 event 12300 0\n@400 event 4116 0 msg=\"pid=5|tid=5\"\n"
                                "@900 event 12300 -1\n@1000 event 4119 -1\n@4000\n");
    const auto json = nlohmann::json::parse(hosttest::readFile(run.dir + "/timeline.json"));
    std::map<int, std::string> trackNames;
    std::set<int> sliceTracks;
    bool counterWithSource = false;
    for (const auto& event : json["traceEvents"]) {
        const std::string ph = event["ph"];
        if (ph != "C" && event["pid"] != 2)
            continue;  // the server's own slices live in a process of their own
        if (ph == "M" && event["name"] == "thread_name")
            trackNames[event["tid"]] = event["args"]["name"];
        if (ph == "X") {
            EXPECT_FALSE(event["name"].get<std::string>().empty());
            ASSERT_GE(event["dur"].get<int64_t>(), 0);
            sliceTracks.insert(event["tid"].get<int>());
        }
        if (ph == "C" && event.contains("cat") && event["cat"] == "scene 4119 game")
            counterWithSource = true;
    }
    EXPECT_TRUE(counterWithSource);
    std::vector<std::string> names;
    for (const int track : sliceTracks) {
        ASSERT_EQ(1u, trackNames.count(track)) << "slices on an unnamed track";
        names.push_back(trackNames[track]);
    }
    // The re-armed launch is two slices; the probe boost lasted its 256 ms.
    EXPECT_EQ(
        (std::vector<std::string>{"on/off commands", "probe boosts", "scenes", "timed actions"}),
        names);
    const auto& summary = nlohmann::json::parse(hosttest::readFile(run.dir + "/summary.json"));
    int launches = 0;
    for (const auto& span : summary["spans"]) {
        launches += span["name"] == "4099 cold_launch";
        if (span["category"] == "probe") {
            EXPECT_EQ(408.0, span["begin_ms"].get<double>());
            EXPECT_EQ(664.0, span["end_ms"].get<double>());
        }
    }
    EXPECT_EQ(2, launches);
}

// A plain replay counts its calls and keeps nothing per call: that is for comparisons.
TEST(ReplayInsightTest, APlainReplayKeepsNothingPerCall) {
    const Replayed run = replay("per-call", "@0 event 4099 0\n@100 setconfig 1 5=2016000\n@200\n");
    EXPECT_EQ(3, run.insight.callCount);
    EXPECT_TRUE(run.insight.callDigests.empty());
    EXPECT_TRUE(run.insight.callStatus.empty());
    EXPECT_EQ(-1, run.insight.divergentCall.index);
    const auto summary = nlohmann::json::parse(hosttest::readFile(run.dir + "/summary.json"));
    EXPECT_EQ(3, summary["calls"]);
}

// The runs part at the launch, the second call: B was compared with A's digests as it went.
TEST(ReplayInsightTest, ComparesTwoConfigurationsDifferingInOneValue) {
    const std::string trace = "@0 setconfig 1 5=2016000\n@100 event 4099 0\n@2000\n";
    const Replayed a = replay("compare-a", trace);
    std::string configB = kConfig;
    configB.replace(configB.find("1804800"), 7, "1497600");
    const std::string dirB = hosttest::configDir("compare-b", configB);
    ReplayOptions options = hosttest::replayOptions(a.dir, a.dir + "/t.trace");
    options.summaryJsonPath = a.dir + "/comparison.json";
    FILE* out = fopen((a.dir + "/compare.txt").c_str(), "w");
    EXPECT_EQ(ReplaySession::kOk, ComparisonRun(options, dirB, out, stderr).run());
    fclose(out);
    const auto json = nlohmann::json::parse(hosttest::readFile(a.dir + "/comparison.json"));
    EXPECT_EQ(1, json["first_divergence"]["call"]["index"]);
    EXPECT_EQ(a.dir + "/t.trace:2", json["first_divergence"]["call"]["where"]);
    EXPECT_EQ("@100 event 4099 0", json["first_divergence"]["call"]["text"]);
    EXPECT_EQ(100.0, json["first_divergence"]["call"]["ms"]);
    EXPECT_EQ("0 cpu.big.min=1804800", json["first_divergence"]["a"]);
    EXPECT_EQ("0 cpu.big.min=1497600", json["first_divergence"]["b"]);
    ASSERT_EQ(1u, json["nodes"].size());
    EXPECT_EQ("cpu.big.min", json["nodes"][0]["key"]);
    EXPECT_EQ(1500.0, std::abs(json["nodes"][0]["residency"][0]["delta_ms"].get<double>()));
}

}  // namespace
}  // namespace velmora
