// The device tree and node map: seeding a fresh simulated device, and node-map overrides with
// their errors. (Writing only on change: HostExecutorTest's re-armed timer.)
#include <gtest/gtest.h>

#include "host/device/DeviceTree.h"
#include "host/time/HostClock.h"
#include "host/device/NodeMap.h"
#include "host/record/Timeline.h"
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
    // Only the nodes of the map can be moved, and only inside the device root.
    EXPECT_EQ(-1, nodes.parse("cpu.mid.max sys/x\n", "nodes.txt", &error));
    EXPECT_EQ("nodes.txt:1: unknown node 'cpu.mid.max'", error);
    EXPECT_EQ(-1, nodes.parse("\ngpu.max ../../etc/passwd\n", "nodes.txt", &error));
    EXPECT_EQ("nodes.txt:2: bad path for node 'gpu.max'", error);
}

}  // namespace
}  // namespace velmora
