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

// Seconds of parse() of `text`; the best of `tries`.
double parseSeconds(const std::string& text, int tries) {
    double best = 1e9;
    for (int i = 0; i < tries; ++i) {
        const auto start = std::chrono::steady_clock::now();
        DeviceProfile profile;
        std::string error;
        profile.parse(text, "P", &error);
        best = std::min(best, std::chrono::duration<double>(std::chrono::steady_clock::now() -
                                                            start).count());
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
