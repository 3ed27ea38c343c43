// The device profile as read from its file (the example device's, and broken ones), and what the
// simulated device makes of written values: rounding between available frequencies, refusals,
// and what a refused or rounded request leaves on the nodes.
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

#include "host/DeviceTree.h"
#include "host/HostClock.h"
#include "host/HostExecutor.h"
#include "host/NodeMap.h"
#include "host/Timeline.h"
#include "host/profile/DeviceProfile.h"
#include "host/profile/KernelRules.h"
#include "tests/host/HostTestSupport.h"

namespace velmora {
namespace {

std::string exampleText() {
    std::ifstream in(std::string(VELMORA_SOURCE_DIR) + "/" + DeviceProfile::kBuiltInOrigin);
    std::stringstream text;
    text << in.rdbuf();
    return text.str();
}

TEST(DeviceProfileTest, BuiltInProfileIsTheExampleFile) {
    DeviceProfile example;
    std::string error;
    ASSERT_EQ(0, example.parse(exampleText(), "example", &error)) << error;
    const DeviceProfile& builtIn = DeviceProfile::builtIn();
    ASSERT_EQ(example.nodes().size(), builtIn.nodes().size());
    for (size_t i = 0; i < example.nodes().size(); ++i) {
        EXPECT_EQ(example.nodes()[i].key, builtIn.nodes()[i].key);
        EXPECT_EQ(example.nodes()[i].seed, builtIn.nodes()[i].seed);
    }
    EXPECT_EQ(-20, builtIn.lowestLevel());
    EXPECT_EQ(40, builtIn.highestLevel());
    // Every node a tag names exists on the example device.
    NodeMap nodes;
    for (int tag : {1, 2, 4, 5, 7, 8, 10, 17, 18, 19, 20, 22, 24, 26, 50, 51, 58}) {
        EXPECT_NE(nullptr, nodes.find(nodes.keyForTag(tag))) << "tag " << tag;
    }
}

struct BadProfile {
    const char* name;
    std::string text;
    std::string error;
};

const BadProfile kBadProfiles[] = {
    {"NotClosed", "<device>\n<node key=\"a\" kind=\"value\" path=\"x\">\n</device>\n",
     "P:2: element <node> is not closed (expected </node> before the enclosing element ends)"},
    {"WrongTop", "<profile/>\n", "P:1: the top-level element must be <device>"},
    {"UnknownKind", "<device>\n<node key=\"a\" kind=\"max\" path=\"x\"/>\n</device>\n",
     "P:2: node 'a' has kind \"max\" (expected floor, cap, value or text)"},
    {"UnknownTable",
     "<device>\n<node key=\"a\" kind=\"floor\" allowed=\"frequencies:gpu\" path=\"x\"/>\n"
     "</device>\n",
     "P:2: allowed=\"frequencies:gpu\" names no table (expected frequencies:ID, governors:ID, "
     "levels, decimal or MIN..MAX)"},
    {"BadFrequency", "<device>\n<frequencies id=\"gpu\">100 2OO</frequencies>\n</device>\n",
     "P:2: frequency '2OO' of table 'gpu' is not a positive whole number"},
    {"AbsolutePath", "<device>\n<node key=\"a\" kind=\"value\" path=\"/sys/x\"/>\n</device>\n",
     "P:2: node 'a' needs a path relative to the device root"},
};

class BadProfileTest : public testing::TestWithParam<BadProfile> {};

TEST_P(BadProfileTest, NamesTheLineAndTheProblem) {
    DeviceProfile profile;
    std::string error;
    EXPECT_EQ(-1, profile.parse(GetParam().text, "P", &error));
    EXPECT_EQ(GetParam().error, error);
    EXPECT_TRUE(profile.nodes().empty());
}

INSTANTIATE_TEST_SUITE_P(Rows, BadProfileTest, testing::ValuesIn(kBadProfiles),
                         [](const testing::TestParamInfo<BadProfile>& info) {
                             return info.param.name;
                         });

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
    {"cpu.little.max", "1500000", V::kRounded, "1497600"},  // a cap rounds down
    {"cpu.big.governor", "performace", V::kRefused, "the device has no governor 'performace'"},
    {"memlat.ratio_b", "6O", V::kRefused, "'6O' is not a number"},
    {"memlat.ratio_b", "0.6", V::kAccepted, "0.6"},
    {"probe.tid", "anything", V::kAccepted, "anything"},
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

TEST(DeviceProfileTest, ExecutorReportsARefusedWriteAndKeepsTheRoundedOne) {
    HostClock clock;
    clock.setVirtual();
    Timeline timeline(clock);
    NodeMap nodes;
    DeviceTree tree(nodes, timeline);
    tree.setRoot(hosttest::makeScratchDir("profile"));
    ASSERT_EQ(0, tree.seed());
    HostExecutor executor(nodes, tree, clock, timeline);

    const int tags[] = {2, 8};
    const int values[] = {1500000, 600000};  // a cap between steps; kHz in an Hz node
    EXPECT_EQ(-1, executor.doPerfSetConfig(1, 2, tags, values));
    EXPECT_EQ("1497600", hosttest::readFile(tree.pathOf("cpu.little.max")));
    EXPECT_EQ("900000000", hosttest::readFile(tree.pathOf("gpu.max")));
    const auto notes = timeline.instants("device");
    ASSERT_EQ(2u, notes.size());
    EXPECT_EQ("cpu.little.max requested 1500000, effective 1497600", notes[0].name);
    EXPECT_EQ("gpu.max refused 600000: 600000 is below the lowest frequency 257000000 Hz",
              notes[1].name);
}

}  // namespace
}  // namespace velmora
