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
}

TEST(NodeMapTest, OverridesChangePathAndSeedAndBadLinesNameTheLine) {
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
    // Only the nodes of the map can be moved, and only inside the device root.
    EXPECT_EQ(-1, nodes.parse("cpu.mid.max sys/x\n", "nodes.txt", &error));
    EXPECT_EQ("nodes.txt:1: unknown node 'cpu.mid.max'", error);
    EXPECT_EQ(-1, nodes.parse("\ngpu.max ../../etc/passwd\n", "nodes.txt", &error));
    EXPECT_EQ("nodes.txt:2: bad path for node 'gpu.max'", error);
}

}  // namespace
}  // namespace velmora
