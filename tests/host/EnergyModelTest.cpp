// The energy model end to end: a hand-made device of three OPPs replays a trace of load lines
// and client limits, and the energy, the starved time, the limits' share and the floor
// holder's cost come out as worked out by hand below, also in the comparison of two
// configurations; how the domain picks its OPP under each governor; load lines the device
// cannot take; the summary without load lines.
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "host/device/profile/DeviceProfile.h"
#include "tests/host/HostTestSupport.h"
#include "tools/energy/OppChoice.h"
#include "tools/replay/ComparisonRun.h"
#include "tools/replay/ReplaySession.h"

namespace velmora {
namespace {

// One little cluster of two CPUs with three OPPs. The server of the example configuration
// writes nodes this device lacks; those writes fail and change nothing here.
const char* const kSmallDevice = R"(<device name="small">
    <frequencies id="cpu.little" unit="kHz">500000 1000000 2000000</frequencies>
    <governors id="cpu">schedutil performance powersave</governors>
    <energy id="cpu.little" cpus="2">
        <opp freq="500000" mw="10"/> <opp freq="1000000" mw="30"/> <opp freq="2000000" mw="100"/>
    </energy>
    <node key="cpu.little.min" kind="floor" allowed="frequencies:cpu.little" seed="500000"
          path="little/scaling_min_freq"/>
    <node key="cpu.little.max" kind="cap" allowed="frequencies:cpu.little" seed="2000000"
          path="little/scaling_max_freq"/>
    <node key="cpu.little.top" kind="value" seed="2000000" path="little/cpuinfo_max_freq"/>
    <node key="cpu.little.governor" kind="text" allowed="governors:cpu" seed="schedutil"
          path="little/scaling_governor"/>
</device>
)";

// Client 1's tag 1 is the little cluster's floor, tag 2 its cap; 0 withdraws a request.
const char* const kSmallTrace = R"(@0    load cpu.little=0.2
@1000 setconfig 1 1=1000000
@2000 load cpu.little=0.9
@3000 setconfig 1 1=0 2=1000000
@4000
)";

struct SmallRun {
    int status = -1;
    InsightResult result;
    std::string out;
    nlohmann::json summary;
};

SmallRun replaySmall(const std::string& trace, const std::string& device = kSmallDevice) {
    const std::string dir = hosttest::makeScratchDir("energy");
    hosttest::writeFile(dir + "/small.xml", device);
    hosttest::writeFile(dir + "/t.trace", trace);
    ReplayOptions options = hosttest::replayOptions(dir, dir + "/t.trace");
    options.configDirs = {hosttest::examplesDir()};
    options.devicePath = dir + "/small.xml";
    options.summaryJsonPath = dir + "/summary.json";
    FILE* out = tmpfile();
    SmallRun run;
    {
        ReplaySession session(options, out, stderr);
        run.status = session.run();
        run.result = session.insight();
    }
    run.out = hosttest::readAndClose(out);
    run.summary = nlohmann::json::parse(hosttest::readFile(dir + "/summary.json"), nullptr, false);
    return run;
}

// top = 2000000 kHz, 2 CPUs; schedutil asks for 1.25 x top x u; power = 2 x mW(f) x busy with
// busy = min(1, u x top / f). The trace ends at its last line, 4000 ms.
//
//  piece        u    floor    cap      asks for  f        busy  mW                  mJ
//  0-1000       0.2  500000   2000000  500000    500000   0.8   2 x 10 x 0.8 = 16   16
//  1000-2000    0.2  1000000  2000000  500000    1000000  0.4   2 x 30 x 0.4 = 24   24
//  2000-3000    0.9  1000000  2000000  2250000   2000000  0.9   2 x 100 x 0.9 = 180 180
//  3000-4000    0.9  500000   1000000  2250000   1000000  1     2 x 30 x 1 = 60     60
//  (saturated from 3000 on: u x top = 1800000 > 1000000)
//
// Without limits: 16 + 16 (f 500000, busy 0.8) + 180 + 180 = 392 mJ, never saturated.
TEST(EnergyReplayTest, HandComputedEnergySaturationAndLimitsShare) {
    const SmallRun run = replaySmall(kSmallTrace);
    ASSERT_EQ(ReplaySession::kOk, run.status) << run.out;
    ASSERT_EQ(4000000, run.result.endUs);
    ASSERT_EQ(1u, run.result.energy.size());
    const DomainEnergy& little = run.result.energy[0];
    EXPECT_EQ("cpu.little", little.id);
    EXPECT_EQ("kHz", little.unit);
    const double energy = 16 + 24 + 180 + 60;      // 280
    const double unlimited = 16 + 16 + 180 + 180;  // 392
    EXPECT_NEAR(energy, little.mJ, 0.5);
    EXPECT_EQ(1000000, little.saturatedUs);
    EXPECT_NEAR(energy - unlimited, little.limitsMJ, 0.5);  // -112: the cap saved energy
    EXPECT_EQ(1000000, little.limitsSaturatedUs);
    const std::vector<std::pair<long long, int64_t>> residency = {
        {500000, 1000000}, {1000000, 2000000}, {2000000, 1000000}};
    EXPECT_EQ(residency, little.residencyUs);
    // The floor cost 24 - 16 mJ from 1000 to 2000 ms; from 2000 to 3000 the load asked for more.
    ASSERT_EQ(1u, little.floorHoldersMJ.size());
    EXPECT_NEAR(8, little.floorHoldersMJ[0].second, 0.5);

    // The same figures in the summary JSON, under the names other tools read.
    ASSERT_FALSE(run.summary.is_discarded());
    const auto& json = run.summary["energy"]["cpu.little"];
    EXPECT_NEAR(energy, json["mJ"].get<double>(), 0.5);
    EXPECT_EQ(1000.0, json["saturated_ms"].get<double>());
    EXPECT_NEAR(energy - unlimited, json["limits_mJ"].get<double>(), 0.5);
    EXPECT_EQ(1000.0, json["limits_saturated_ms"].get<double>());
    EXPECT_EQ(2000.0, json["residency"]["1000000"].get<double>());
    EXPECT_NEAR(8, json["floor_holders"][little.floorHoldersMJ[0].first].get<double>(), 0.5);
    // And in the text.
    EXPECT_NE(std::string::npos, run.out.find("cpu.little            280.0       1000.0"))
        << run.out;
}

TEST(EnergyReplayTest, WithoutLoadLinesThereIsNoEstimate) {
    const SmallRun run = replaySmall("@1000 setconfig 1 1=1000000\n@2000\n");
    ASSERT_EQ(ReplaySession::kOk, run.status);
    EXPECT_TRUE(run.result.energy.empty());
    EXPECT_FALSE(run.summary.contains("energy"));
    EXPECT_NE(std::string::npos, run.out.find("\nno load in the trace: no energy estimate\n"));
}

// A domain that a load line never names has load 0: it draws nothing, whatever its floor.
TEST(EnergyReplayTest, AnUnnamedDomainDrawsNothing) {
    const SmallRun run = replaySmall("@0 load cpu.little=0\n@1000 setconfig 1 1=2000000\n@2000\n");
    ASSERT_EQ(1u, run.result.energy.size());
    EXPECT_EQ(0, run.result.energy[0].mJ);
    EXPECT_EQ(0, run.result.energy[0].saturatedUs);
}

// A cold launch that holds a floor on the little cluster for 1.5 s; B raises the floor.
const char* const kLaunchConfig = R"(<policy>
  <cmd id="5376" name="defaults"><act><duration>0</duration><tag_51>0</tag_51><tag_52>0</tag_52>
    <tag_53>0</tag_53><tag_54>0</tag_54><tag_55>0</tag_55><tag_56>0</tag_56><tag_57>0</tag_57>
    <tag_58>0</tag_58></act></cmd>
  <cmd id="4116" name="probe"><act><duration>100</duration><little_min>1000000</little_min></act></cmd>
  <cmd id="4099" name="cold_launch"><act><duration>1500</duration><little_min>1000000</little_min></act></cmd>
</policy>
)";

// u = 0.2 throughout (needs 400000 kHz, asks for 500000); the launch floor holds 1000-2500 ms.
//   A, floor 1000000: 16 mW x 1 s + 2 x 30 x 0.4 = 24 mW x 1.5 s + 16 mW x 0.5 s = 16 + 36 + 8 = 60
//   B, floor 2000000: 16 + 2 x 100 x 0.2 = 40 mW x 1.5 s + 8 = 16 + 60 + 8 = 84
// The comparison puts the +24 mJ first; the report of run A carries the energy plots.
TEST(EnergyReplayTest, ComparisonPutsTheEnergyDeltaFirst) {
    const std::string dirA = hosttest::configDir("energy-compare", kLaunchConfig);
    hosttest::writeFile(dirA + "/small.xml", kSmallDevice);
    hosttest::writeFile(dirA + "/t.trace", "@0 load cpu.little=0.2\n@1000 event 4099 0\n@3000\n");
    std::string configB = kLaunchConfig;
    const std::string launch = "<duration>1500</duration><little_min>1000000";
    configB.replace(configB.find(launch), launch.size(),
                    "<duration>1500</duration><little_min>2000000");
    const std::string fileB = dirA + "/changed.xml";
    hosttest::writeFile(fileB, configB);
    ReplayOptions options = hosttest::replayOptions(dirA, dirA + "/t.trace");
    options.devicePath = dirA + "/small.xml";
    options.summaryJsonPath = dirA + "/comparison.json";
    options.reportPath = dirA + "/report.html";
    FILE* out = tmpfile();
    ComparisonRun run(options, fileB, out, stderr);
    run.setCompareOnly(true);
    ASSERT_EQ(ReplaySession::kOk, run.run());
    const std::string text = hosttest::readAndClose(out);
    const auto json = nlohmann::json::parse(hosttest::readFile(dirA + "/comparison.json"));
    const auto& little = json["energy"]["cpu.little"];
    EXPECT_NEAR(60, little["a_mJ"].get<double>(), 0.5);
    EXPECT_NEAR(84, little["b_mJ"].get<double>(), 0.5);
    EXPECT_NEAR(24, little["delta_mJ"].get<double>(), 0.5);
    EXPECT_EQ(0.0, little["delta_saturated_ms"].get<double>());
    // Right after the headline, before where the runs part.
    const size_t energy = text.find("energy and starved time per domain, A -> B\n");
    ASSERT_NE(std::string::npos, energy) << text;
    EXPECT_EQ(text.find('\n') + 1, energy) << text;
    EXPECT_LT(energy, text.find("first divergence")) << text;
    EXPECT_NE(std::string::npos, text.find("cpu.little             60.0         84.0        +24.0"))
        << text;
    const std::string report = hosttest::readFile(dirA + "/report.html");
    EXPECT_NE(std::string::npos, report.find("cpu.little: effective frequency (energy model)"));
    EXPECT_NE(std::string::npos, report.find("cpu.little: power (energy model)"));
}

struct OppRow {
    const char* governor;
    double floor;
    double cap;
    double u;
    long long freq;  // the OPP the domain runs at
    bool saturated;
};

// The small device's table (500000, 1000000, 2000000; top 2000000).
TEST(OppChoiceTest, PicksTheOppLikeTheKernel) {
    EnergyTable table;
    table.cpus = 2;
    table.opps = {{500000, 10}, {1000000, 30}, {2000000, 100}};
    const OppRow rows[] = {
        {"schedutil", 500000, 2000000, 0, 500000, false},
        // 1.25 x 2000000 x 0.4 = 1000000 exactly: that OPP, not the one above.
        {"schedutil", 500000, 2000000, 0.4, 1000000, false},
        {"schedutil", 500000, 2000000, 0.41, 2000000, false},
        {"simple_ondemand", 500000, 2000000, 0.3, 1000000, false},
        // A floor above the cap: the cap wins, as in the kernel.
        {"schedutil", 2000000, 1000000, 0.1, 1000000, false},
        // Asking for more than the cap: the cap, and starved when the load needs more.
        {"schedutil", 500000, 1000000, 0.6, 1000000, true},
        {"schedutil", 500000, 2000000, 1, 2000000, false},
        {"performance", 500000, 2000000, 0, 2000000, false},
        {"performance", 500000, 1000000, 0.9, 1000000, true},
        {"powersave", 1000000, 2000000, 0.9, 1000000, true},
        {"powersave", 500000, 2000000, 0.1, 500000, false},
        // A cap between OPPs (a device that does not round): the highest OPP below it.
        {"schedutil", 500000, 1500000, 0.7, 1000000, true},
    };
    for (const auto& row : rows) {
        const OppChoice::Limits limits{row.floor, row.cap, 2000000,
                                       OppChoice::governorOf(row.governor)};
        const size_t opp = OppChoice::resolve(table, limits, row.u);
        EXPECT_EQ(row.freq, table.opps[opp].freq)
            << row.governor << " " << row.floor << ".." << row.cap << " u " << row.u;
        EXPECT_EQ(row.saturated, OppChoice::saturated(table, opp, 2000000, row.u)) << row.u;
    }
    // Busy share times the domain's power: half of 2 x 100 mW, and never more than all of it.
    EXPECT_DOUBLE_EQ(100, OppChoice::powerMw(table, 2, 2000000, 0.5));
    EXPECT_DOUBLE_EQ(60, OppChoice::powerMw(table, 1, 2000000, 0.9));
}

// Load lines the example device cannot take (the parser's own rows are TraceParserTest's):
// reported with the line, nothing replayed, status 1.
TEST(LoadLineTest, BadLoadLinesAreBadInput) {
    const std::pair<std::string, std::string> rows[] = {
        {"load cpu.big=1.5", "t.trace:2: load '1.5' of cpu.big is not a number in [0, 1]"},
        {"load cpu.bg=0.5",
         "t.trace:2: load of 'cpu.bg': the device has no such domain (cpu.little, cpu.big, gpu, "
         "ddr); did you mean 'cpu.big'?"},
        {"load ddr=0.5",
         "t.trace:2: load of 'ddr': the device profile has no energy table for it (it has "
         "cpu.little, cpu.big, gpu)"},
    };
    const std::string dir = hosttest::makeScratchDir("load-lines");
    for (const auto& row : rows) {
        hosttest::writeFile(dir + "/t.trace", "@0 load cpu.little=0.5\n" + row.first + "\n");
        ReplayOptions options = hosttest::replayOptions(dir, dir + "/t.trace");
        options.configDirs = {hosttest::examplesDir()};
        FILE* err = tmpfile();
        ReplaySession session(options, stdout, err);
        EXPECT_EQ(ReplaySession::kBadInput, session.run()) << row.first;
        EXPECT_EQ(0, session.calls());
        EXPECT_EQ("velmora-replay: " + dir + "/" + row.second + "\n", hosttest::readAndClose(err));
    }
}

}  // namespace
}  // namespace velmora
