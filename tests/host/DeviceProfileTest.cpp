// The device profile as read from its file (the example device's, and broken ones), and what the
// simulated device makes of written values: rounding between available frequencies and refusals.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>

#include "host/device/NodeMap.h"
#include "host/device/profile/DeviceProfile.h"
#include "host/device/profile/KernelRules.h"

namespace velmora {
namespace {

// The built-in profile is the example device's file, built in at configure time; its nodes
// and seeds are DeviceTreeTest's.
TEST(DeviceProfileTest, BuiltInProfileHasTheLevelRangeAndANodeForEveryTag) {
    EXPECT_EQ(-20, DeviceProfile::builtIn().lowestLevel());
    EXPECT_EQ(40, DeviceProfile::builtIn().highestLevel());
    // Every node a tag names exists on the example device.
    NodeMap nodes;
    for (int tag : {1, 2, 4, 5, 7, 8, 10, 17, 18, 19, 20, 22, 24, 26, 50, 51, 58}) {
        EXPECT_NE(nullptr, nodes.find(nodes.keyForTag(tag))) << "tag " << tag;
    }
}

// `count` nodes k0, k1, ... on lines 2 on, then k0 once more.
std::string manyNodesAndATwin(int count) {
    std::string text = "<device>\n";
    for (int i = 0; i < count; ++i)
        text += "<node key=\"k" + std::to_string(i) + "\" kind=\"value\" path=\"x\"/>\n";
    return text + "<node key=\"k0\" kind=\"value\" path=\"x\"/>\n</device>\n";
}

// A device of one domain with three frequencies and `energy` as its energy table, from line 3.
std::string withEnergy(const std::string& energy) {
    return "<device>\n<frequencies id=\"cpu\" unit=\"kHz\">100 200 300</frequencies>\n" + energy +
           "<node key=\"cpu.min\" kind=\"floor\" path=\"x\"/>\n</device>\n";
}

struct BadProfile {
    const char* name;
    std::string text;
    std::string error;
};

const BadProfile kBadProfiles[] = {
    {"NotClosed", "<device>\n<node key=\"a\" kind=\"value\" path=\"x\">\n</device>\n",
     "P:2: element <node> is not closed (expected </node> before the enclosing element ends)"},
    {"UnknownKind", "<device>\n<node key=\"a\" kind=\"max\" path=\"x\"/>\n</device>\n",
     "P:2: node 'a' has kind \"max\" (expected floor, cap, value or text)"},
    {"AbsolutePath", "<device>\n<node key=\"a\" kind=\"value\" path=\"/sys/x\"/>\n</device>\n",
     "P:2: node 'a' needs a path relative to the device root"},
    // Energy tables: one <opp> per available frequency, by increasing frequency, with a power
    // that is not negative and does not fall.
    {"OppMissing",
     withEnergy("<energy id=\"cpu\" cpus=\"2\">\n<opp freq=\"100\" mw=\"1\"/>\n"
                "<opp freq=\"300\" mw=\"3\"/>\n</energy>\n"),
     "P:3: energy table 'cpu' has no OPP for 200 (every available frequency of the domain needs "
     "one)"},
    {"OppTwice",
     withEnergy("<energy id=\"cpu\" cpus=\"2\">\n<opp freq=\"100\" mw=\"1\"/>\n"
                "<opp freq=\"100\" mw=\"1\"/>\n</energy>\n"),
     "P:5: OPP 100 of energy table 'cpu' is listed twice (first on line 4)"},
    {"OppsNotIncreasing",
     withEnergy("<energy id=\"cpu\" cpus=\"2\">\n<opp freq=\"200\" mw=\"2\"/>\n"
                "<opp freq=\"100\" mw=\"2\"/>\n</energy>\n"),
     "P:5: OPP 100 of energy table 'cpu' comes after 200: list the OPPs by increasing "
     "frequency"},
    {"PowerFalls",
     withEnergy("<energy id=\"cpu\" cpus=\"2\">\n<opp freq=\"100\" mw=\"2\"/>\n"
                "<opp freq=\"200\" mw=\"1.5\"/>\n</energy>\n"),
     "P:5: OPP 200 of energy table 'cpu' draws 1.5 mW, less than the 2 mW of the OPP below it: "
     "power must not fall as frequency rises"},
    {"OppNotAvailable",
     withEnergy("<energy id=\"cpu\" cpus=\"2\">\n<opp freq=\"150\" mw=\"1\"/>\n</energy>\n"),
     "P:4: OPP 150 of energy table 'cpu' is not an available frequency of 'cpu'"},
    {"NegativePower",
     withEnergy("<energy id=\"cpu\" cpus=\"2\">\n<opp freq=\"100\" mw=\"-1\"/>\n</energy>\n"),
     "P:4: OPP 100 of energy table 'cpu' has a negative power (-1 mW)"},
    {"PowerNotANumber",
     withEnergy("<energy id=\"cpu\" cpus=\"2\">\n<opp freq=\"100\" mw=\"inf\"/>\n</energy>\n"),
     "P:4: <opp> of energy table 'cpu' needs freq=\"...\" (a whole number) and mw=\"...\" (a "
     "number of milliwatts)"},
    {"EnergyOfNoDomain", withEnergy("<energy id=\"gpu\" cpus=\"1\"/>\n"),
     "P:3: <energy id=\"gpu\"> names no <frequencies> table"},
    {"EnergyTwice",
     withEnergy("<energy id=\"cpu\" cpus=\"1\"><opp freq=\"100\" mw=\"1\"/><opp freq=\"200\" "
                "mw=\"2\"/><opp freq=\"300\" mw=\"3\"/></energy>\n<energy id=\"cpu\" "
                "cpus=\"1\"/>\n"),
     "P:4: energy table 'cpu' is defined twice (first on line 3)"},
    {"EnergyWithoutCpus", withEnergy("<energy id=\"cpu\">\n</energy>\n"),
     "P:3: energy table 'cpu' needs cpus=\"N\", the number of CPUs of the domain (1..1024)"},
    // Each node was compared with every node before it: half a minute for 50,000.
    {"TwinAmongFiftyThousandNodes", manyNodesAndATwin(50000),
     "P:50002: node 'k0' is defined twice (first on line 2)"},
};

class BadProfileTest : public testing::TestWithParam<BadProfile> {};

TEST_P(BadProfileTest, NamesTheLineAndTheProblem) {
    DeviceProfile profile;
    std::string error;
    EXPECT_EQ(-1, profile.parse(GetParam().text, "P", &error));
    EXPECT_EQ(GetParam().error, error);
}

INSTANTIATE_TEST_SUITE_P(Rows, BadProfileTest, testing::ValuesIn(kBadProfiles),
                         [](const testing::TestParamInfo<BadProfile>& info) {
                             return info.param.name;
                         });

// The example device's energy tables: one per CPU cluster and the GPU, an OPP per frequency.
TEST(DeviceProfileTest, ExampleDeviceHasAnEnergyTablePerClusterAndTheGpu) {
    const DeviceProfile& device = DeviceProfile::builtIn();
    EXPECT_EQ((std::vector<std::string>{"cpu.little", "cpu.big", "gpu", "ddr"}),
              device.frequencyDomains());
    ASSERT_EQ(3u, device.energyTables().size());
    for (const char* id : {"cpu.little", "cpu.big", "gpu"}) {
        const EnergyTable* table = device.energyTable(id);
        ASSERT_NE(nullptr, table) << id;
        EXPECT_EQ(device.find(std::string(id) + ".min")->rule.steps.size(), table->opps.size());
    }
    EXPECT_EQ(nullptr, device.energyTable("ddr"));
    EXPECT_EQ(4, device.energyTable("cpu.big")->cpus);
}

// Seconds of parse() of `text`; the best of `tries`.
double parseSeconds(const std::string& text, int tries) {
    double best = 1e9;
    for (int i = 0; i < tries; ++i) {
        const auto start = std::chrono::steady_clock::now();
        DeviceProfile profile;
        std::string error;
        profile.parse(text, "P", &error);
        best = std::min(
            best, std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
    }
    return best;
}

// Eight times the nodes may take eight times as long, not sixty-four (each node compared with
// all before it, the TwinAmongFiftyThousandNodes row).
TEST(DeviceProfileTest, ParseTakesTimeInProportionToTheNodes) {
    const double small = parseSeconds(manyNodesAndATwin(10000), 3);
    const double large = parseSeconds(manyNodesAndATwin(80000), 1);
    EXPECT_LT(large, 25 * small) << small << " s for 10,000 nodes, " << large << " s for 80,000";
}

struct Write {
    const char* key;
    const char* requested;
    KernelRules::Verdict verdict;
    const char* effective;  // or the reason of a refusal
};

using V = KernelRules::Verdict;
const Write kWrites[] = {
    {"cpu.little.min", "1804800", V::kAccepted, "1804800"},
    {"cpu.little.min", "1500000", V::kRounded, "1593600"},  // a floor rounds up
    {"cpu.big.governor", "performace", V::kRefused, "the device has no governor 'performace'"},
    {"memlat.ratio_b", "6O", V::kRefused, "'6O' is not a number"},
};

class KernelRulesTest : public testing::TestWithParam<Write> {};

TEST_P(KernelRulesTest, TakesTheWriteLikeTheKernel) {
    const Write& w = GetParam();
    const NodeSpec* spec = DeviceProfile::builtIn().find(w.key);
    ASSERT_NE(nullptr, spec);
    const KernelRules::Outcome outcome = KernelRules::take(*spec, w.requested);
    EXPECT_EQ(w.verdict, outcome.verdict);
    EXPECT_EQ(w.effective, w.verdict == V::kRefused ? outcome.reason : outcome.effective);
}

INSTANTIATE_TEST_SUITE_P(Rows, KernelRulesTest, testing::ValuesIn(kWrites));

}  // namespace
}  // namespace velmora
