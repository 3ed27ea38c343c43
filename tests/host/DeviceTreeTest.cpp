// The device tree and node map: seeding a fresh simulated device, writing only on change,
// falling back to the first value seen, and node-map overrides with their errors.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "host/DeviceTree.h"
#include "host/HostClock.h"
#include "host/NodeMap.h"
#include "host/Timeline.h"
#include "tests/host/HostTestSupport.h"

namespace velmora {
namespace {

class DeviceTreeTest : public testing::Test {
protected:
    void SetUp() override {
        mClock.setVirtual();
        mRoot = hosttest::makeScratchDir("tree");
        mTree.setRoot(mRoot);
    }
    HostClock mClock;
    Timeline mTimeline{mClock};
    NodeMap mNodes;
    DeviceTree mTree{mNodes, mTimeline};
    std::string mRoot;
};

TEST_F(DeviceTreeTest, SeedCreatesEveryNodeAtItsSeedValue) {
    ASSERT_EQ(0, mTree.seed());
    EXPECT_EQ("2841600", hosttest::readFile(
                             mRoot + "/sys/devices/system/cpu/cpufreq/policy4/scaling_max_freq"));
    EXPECT_EQ("0", hosttest::readFile(mRoot + "/dev/stune/top-app/schedtune.boost"));
    EXPECT_EQ("0", hosttest::readFile(mRoot + "/dev/stune/schedtune.boost"));  // root group
    for (const auto& node : mNodes.nodes()) {
        EXPECT_EQ(node.seed, hosttest::readFile(mTree.pathOf(node.key))) << node.key;
    }
}

// A node is written only when its value changes: an unchanged write leaves the file alone
// (a value planted behind the tree's back survives it) and records nothing.
TEST_F(DeviceTreeTest, WritesOnlyWhenTheValueChanges) {
    ASSERT_EQ(0, mTree.seed());
    const std::string path = mTree.pathOf("gpu.max");
    ASSERT_EQ(0, mTree.write("gpu.max", "600000000"));
    hosttest::writeFile(path, "planted\n");
    ASSERT_EQ(0, mTree.write("gpu.max", "600000000"));
    EXPECT_EQ("planted", hosttest::readFile(path));
    EXPECT_EQ(1, mTimeline.changes("gpu.max"));
    ASSERT_EQ(0, mTree.write("gpu.max", "900000000"));
    EXPECT_EQ("900000000", hosttest::readFile(path));
    EXPECT_EQ(2, mTimeline.changes("gpu.max"));

    std::string base;
    ASSERT_TRUE(mTree.baseline("gpu.max", &base));
    EXPECT_EQ("900000000", base);
    const auto summary = mTimeline.summary();
    ASSERT_EQ(1u, summary.size());
    EXPECT_EQ("900000000", summary[0].initial);
    EXPECT_EQ(6e8, summary[0].min);
    EXPECT_EQ(9e8, summary[0].max);
}

TEST_F(DeviceTreeTest, UnknownOrUnwritableNodesFail) {
    EXPECT_EQ(-1, mTree.write("cpu.medium.max", "1"));
    mTree.setRoot(mRoot + "/not-a-dir/file");
    hosttest::writeFile(mRoot + "/not-a-dir", "x");
    EXPECT_EQ(-1, mTree.write("gpu.max", "1"));
    std::string text;
    EXPECT_FALSE(mTree.read("gpu.max", &text));
}

TEST(NodeMapTest, OverridesChangePathAndSeed) {
    NodeMap nodes;
    std::string error;
    ASSERT_EQ(0, nodes.parse("# six big cores on policy6\n"
                             "cpu.big.max  /sys/devices/system/cpu/cpufreq/policy6/scaling_max_freq"
                             "  3000000\n\n"
                             "gpu.min sys/class/devfreq/mali/min_freq # no seed\n",
                             "nodes.txt", &error))
        << error;
    EXPECT_EQ("sys/devices/system/cpu/cpufreq/policy6/scaling_max_freq",
              nodes.find("cpu.big.max")->path);
    EXPECT_EQ("3000000", nodes.find("cpu.big.max")->seed);
    EXPECT_EQ("257000000", nodes.find("gpu.min")->seed);
    EXPECT_EQ("cpu.big.max", nodes.keyForTag(5));
}

TEST(NodeMapTest, BadLinesNameFileAndLine) {
    struct Case {
        const char* text;
        const char* error;
    };
    const Case cases[] = {
        // Only the nodes of the map can be moved.
        {"cpu.mid.max sys/x\n", "nodes.txt:1: unknown node 'cpu.mid.max'"},
        // Every node needs a path.
        {"\n\ngpu.max\n", "nodes.txt:3: missing path for node 'gpu.max'"},
        // Paths stay inside the device root.
        {"gpu.max ../../etc/passwd\n", "nodes.txt:1: bad path for node 'gpu.max'"},
        {"gpu.max sys/a 1 2\n", "nodes.txt:1: unexpected text '2'"},
    };
    for (const auto& c : cases) {
        NodeMap nodes;
        std::string error;
        EXPECT_EQ(-1, nodes.parse(c.text, "nodes.txt", &error)) << c.text;
        EXPECT_EQ(c.error, error);
    }
    NodeMap nodes;
    std::string error;
    EXPECT_EQ(-1, nodes.load("/nonexistent/nodes.txt", &error));
    EXPECT_EQ("/nonexistent/nodes.txt: cannot open node map", error);
}

}  // namespace
}  // namespace velmora
