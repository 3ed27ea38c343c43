// Requests of several sources on one node, and above all the same request made again (the
// server re-sends every group level whenever one moves): it must leave the node and its holder
// as they are, yet still count as the latest request, and a fresh device must be looked at anew.
// The observer hears of every resolution with the value in force and its holder.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "host/device/DeviceTree.h"
#include "host/device/NodeMap.h"
#include "host/device/NodeResolver.h"
#include "host/record/ExecutorObserver.h"
#include "host/record/Timeline.h"
#include "host/time/HostClock.h"
#include "tests/host/HostTestSupport.h"

namespace velmora {
namespace {

// Keeps "key=value@holder" for every resolution.
class Resolutions : public ExecutorObserver {
public:
    void onCommandApplied(int, const std::string&, const std::string&, int) override {}
    void onCommandWithdrawn(int, bool) override {}
    void onProbeBoost(unsigned int, bool) override {}
    void onFreqConfig(int, const std::string&, int) override {}
    void onNodeResolved(const std::string& key, const std::string& value,
                        const std::string& source) override {
        seen.push_back(key + "=" + value + "@" + source);
    }
    std::vector<std::string> take() {
        std::vector<std::string> out;
        out.swap(seen);
        return out;
    }

    std::vector<std::string> seen;
};

class NodeResolverTest : public testing::Test {
protected:
    void SetUp() override {
        mClock.setVirtual();
        mTree.setRoot(hosttest::makeScratchDir("resolver"));
        ASSERT_EQ(0, mTree.seed());
        mResolver.setObserver(&mSeen);
    }
    std::string node(const std::string& key) { return hosttest::readFile(mTree.pathOf(key)); }

    HostClock mClock;
    Timeline mTimeline{mClock};
    NodeMap mNodes;
    DeviceTree mTree{mNodes, mTimeline};
    NodeResolver mResolver{mNodes, mTree, &mTimeline};
    Resolutions mSeen;
};

using Seen = std::vector<std::string>;

TEST_F(NodeResolverTest, AskingAgainForTheHeldValueKeepsNodeAndHolderAndIsReported) {
    const std::string group = "sched.group.top_app";
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));
    EXPECT_EQ((Seen{group + "=10@sched", group + "=10@sched", group + "=10@sched"}), mSeen.take());
    EXPECT_EQ("10", node(group));
    EXPECT_EQ(1, mTimeline.changes(group));  // written once
    ASSERT_EQ(0, mResolver.set(group, "sched", "20"));
    EXPECT_EQ((Seen{group + "=20@sched"}), mSeen.take());
    EXPECT_EQ("20", node(group));
}

// "Latest wins": a source asking again for its value takes the node back from a later one.
TEST_F(NodeResolverTest, AskingAgainMakesARequestTheLatestOnceMore) {
    const std::string group = "sched.group.top_app";
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));
    ASSERT_EQ(0, mResolver.set(group, "cmd:4099", "30"));
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));
    EXPECT_EQ("10", node(group));
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));  // now the holder: nothing moves
    ASSERT_EQ(0, mResolver.clear(group, "sched"));
    EXPECT_EQ((Seen{group + "=10@sched", group + "=30@cmd:4099", group + "=10@sched",
                    group + "=10@sched", group + "=30@cmd:4099"}),
              mSeen.take());
    EXPECT_EQ("30", node(group));
}

// Floors: among equal requests the latest holds the value; a refreshed one becomes the latest,
// and withdrawing the other leaves it in force.
TEST_F(NodeResolverTest, EqualFloorsAreHeldByTheOneAskedLast) {
    const std::string floor = "cpu.big.min";
    ASSERT_EQ(0, mResolver.set(floor, "freq", "1804800"));
    ASSERT_EQ(0, mResolver.set(floor, "cmd:4099", "1804800"));
    ASSERT_EQ(0, mResolver.set(floor, "freq", "1804800"));
    ASSERT_EQ(0, mResolver.set(floor, "freq", "1804800"));
    ASSERT_EQ(0, mResolver.clear(floor, "cmd:4099"));
    EXPECT_EQ((Seen{floor + "=1804800@freq", floor + "=1804800@cmd:4099",
                    floor + "=1804800@freq", floor + "=1804800@freq", floor + "=1804800@freq"}),
              mSeen.take());
    EXPECT_EQ("1804800", node(floor));
}

// A rounded request is rounded (and noted) every time it is made, never taken as held.
TEST_F(NodeResolverTest, ARoundedRequestIsNotedEachTime) {
    const std::string floor = "cpu.big.min";
    ASSERT_EQ(0, mResolver.set(floor, "freq", "1800000"));
    ASSERT_EQ(0, mResolver.set(floor, "freq", "1800000"));
    EXPECT_EQ((Seen{floor + "=1804800@freq", floor + "=1804800@freq"}), mSeen.take());
    EXPECT_EQ(2u, mTimeline.instants("device").size());
    EXPECT_EQ(-1, mResolver.set(floor, "freq", "99"));  // refused: the earlier request stays
    EXPECT_EQ("1804800", node(floor));
}

// A device seeded again has forgotten what was written: the same request writes the node again.
TEST_F(NodeResolverTest, AFreshDeviceIsWrittenAgain) {
    const std::string group = "sched.group.top_app";
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));
    ASSERT_EQ(0, mTree.seed());
    EXPECT_EQ("0", node(group));
    ASSERT_EQ(0, mResolver.set(group, "sched", "10"));
    EXPECT_EQ("10", node(group));
}

}  // namespace
}  // namespace velmora
