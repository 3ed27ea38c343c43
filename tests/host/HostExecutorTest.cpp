// What reaches the device nodes: timed actions (expiry, re-arm, withdraw), requests of several
// sources on one node, group levels, probe boosts, queries and what the device refuses. Runs on
// a simulated device in virtual time, so expiry happens exactly when the clock is advanced.
#include <gtest/gtest.h>

#include <chrono>

#include <unistd.h>

#include <memory>

#include "config/Action.h"
#include "host/device/DeviceTree.h"
#include "host/device/NodeMap.h"
#include "host/platform/HostExecutor.h"
#include "host/record/Timeline.h"
#include "host/time/HostClock.h"
#include "tests/host/HostTestSupport.h"

namespace velmora {
namespace {

class HostExecutorTest : public testing::Test {
protected:
    void SetUp() override {
        setClock();
        mTree.setRoot(hosttest::makeScratchDir("executor"));
        ASSERT_EQ(0, mTree.seed());
        mExecutor.reset(new HostExecutor(mNodes, mTree, mClock, mTimeline));
    }

    virtual void setClock() { mClock.setVirtual(); }
    std::string node(const std::string& key) { return hosttest::readFile(mTree.pathOf(key)); }

    static Action action(int cmdId, int duration, std::vector<int32_t> pairs) {
        Action a;
        a.mCmdId = cmdId;
        a.mName = "test";
        a.mDuration = duration;
        a.mParamNum = static_cast<int32_t>(pairs.size() / 2);
        a.mTagValues = std::move(pairs);
        return a;
    }
    int apply(const Action& a, int payload) { return mExecutor->doAction(&a, 1, &payload); }

    HostClock mClock;
    Timeline mTimeline{mClock};
    NodeMap mNodes;
    DeviceTree mTree{mNodes, mTimeline};
    std::unique_ptr<HostExecutor> mExecutor;
};

TEST_F(HostExecutorTest, TimedActionRevertsWhenItsDurationExpires) {
    const Action boost = action(4099, 1500, {1, 1804800, 4, 2419200, 20, 1});
    ASSERT_EQ(0, apply(boost, 0));
    EXPECT_EQ("1804800", node("cpu.little.min"));
    EXPECT_EQ("2419200", node("cpu.big.min"));
    EXPECT_EQ("1", node("sched.fork_on_big"));

    mClock.advanceTo(1499);
    EXPECT_EQ("1804800", node("cpu.little.min"));
    mClock.advanceTo(1500);
    EXPECT_EQ("300000", node("cpu.little.min"));
    EXPECT_EQ("710400", node("cpu.big.min"));
    EXPECT_EQ("0", node("sched.fork_on_big"));
}

TEST_F(HostExecutorTest, SameCommandAgainReArmsTheTimer) {
    const Action boost = action(4098, 400, {1, 1401600});
    ASSERT_EQ(0, apply(boost, 0));
    mClock.advanceTo(300);
    ASSERT_EQ(0, apply(boost, 0));  // deadline now 700
    mClock.advanceTo(600);
    EXPECT_EQ("1401600", node("cpu.little.min"));
    mClock.advanceTo(700);
    EXPECT_EQ("300000", node("cpu.little.min"));
    // Applying the same value again wrote nothing: one write up, one back down.
    EXPECT_EQ(2, mTimeline.changes("cpu.little.min"));
}

TEST_F(HostExecutorTest, PayloadMinusOneWithdrawsATimedActionEarly) {
    const Action boost = action(4100, 3000, {4, 1804800});
    ASSERT_EQ(0, apply(boost, 0));
    ASSERT_EQ(0, apply(boost, -1));
    EXPECT_EQ("710400", node("cpu.big.min"));
    // A later expiry must not touch a floor someone else set in the meantime.
    ASSERT_EQ(0, apply(action(4101, 5000, {4, 1497600}), 0));
    mClock.advanceTo(3000);
    EXPECT_EQ("1497600", node("cpu.big.min"));
}

// Floors combine by the largest request and caps by the smallest; withdrawing one request
// leaves the others in force.
TEST_F(HostExecutorTest, RequestsOfDifferentSourcesCombinePerNode) {
    const Action scene = action(4119, 0, {1, 1209600, 101, 200});
    const Action launch = action(4099, 1000, {1, 1804800});
    ASSERT_EQ(0, apply(scene, 0));
    ASSERT_EQ(0, apply(launch, 0));
    EXPECT_EQ("1804800", node("cpu.little.min"));
    mClock.advanceTo(1000);
    EXPECT_EQ("1209600", node("cpu.little.min"));  // the scene's floor remains

    const int tags[] = {2};
    const int caps[] = {1497600};
    ASSERT_EQ(0, mExecutor->doPerfSetConfig(1, 1, tags, caps));
    ASSERT_EQ(0, apply(action(12288, 0, {2, 1401600}), 0));
    EXPECT_EQ("1401600", node("cpu.little.max"));
    ASSERT_EQ(0, apply(action(12288, 0, {2, 1401600}), -1));
    EXPECT_EQ("1497600", node("cpu.little.max"));
    const int release[] = {0};
    ASSERT_EQ(0, mExecutor->doPerfSetConfig(1, 1, tags, release));
    EXPECT_EQ("1804800", node("cpu.little.max"));
    ASSERT_EQ(0, apply(scene, -1));
    EXPECT_EQ("300000", node("cpu.little.min"));
}

// Levels of -100 stand for "nothing requested"; unknown groups and read-only tags are refused.
TEST_F(HostExecutorTest, GroupLevelsReachTheirNodesAndBadTagsAreRefused) {
    const int groups[] = {51, 53, 58};
    const int levels[] = {10, -100, -20};
    ASSERT_EQ(0, mExecutor->doSchedLevelAction(3, groups, levels));
    EXPECT_EQ("0", node("sched.group.top_app"));  // -100: nothing requested, baseline

    const int bad[] = {49};
    EXPECT_EQ(-1, mExecutor->doSchedLevelAction(1, bad, levels));
    const int readOnly[] = {24};
    EXPECT_EQ(-1, mExecutor->doPerfSetConfig(1, 1, readOnly, levels));
}

TEST_F(HostExecutorTest, QueriesReadTheNodes) {
    const int tags[] = {22, 24, 26, 5, 53, 999};
    int values[] = {-1, -1, -1, -1, -1, -1};
    EXPECT_EQ(-1, mExecutor->doPerfGetConfig(6, tags, values));  // 999 has no node
    EXPECT_EQ((std::vector<int>{1804800, 2841600, 900000000, 2841600, 0, -1}),
              std::vector<int>(values, values + 6));
}

TEST_F(HostExecutorTest, ProbeBoostLastsWhileAnyThreadIsBoosted) {
    const Action probe = action(4116, 100, {1, 1209600});
    ASSERT_EQ(0, mExecutor->setProbeTid(2133, 0));
    ASSERT_EQ(0, apply(probe, 0));
    ASSERT_EQ(0, mExecutor->setProbeTid(2140, 0));
    ASSERT_EQ(0, apply(probe, 0));
    EXPECT_EQ("2140", node("probe.tid"));
    EXPECT_EQ("2", node("probe.threads"));
    EXPECT_EQ("1209600", node("cpu.little.min"));
    ASSERT_EQ(0, mExecutor->setProbeTid(2140, -1));
    ASSERT_EQ(0, apply(probe, -1));
    EXPECT_EQ("1209600", node("cpu.little.min"));
    EXPECT_EQ("1", node("probe.threads"));
    ASSERT_EQ(0, mExecutor->setProbeTid(2133, -1));
    ASSERT_EQ(0, apply(probe, -1));
    EXPECT_EQ("300000", node("cpu.little.min"));
    EXPECT_EQ("0", node("probe.tid"));
}

// What the device profile makes of a refused or rounded request, on the nodes and the timeline.
TEST_F(HostExecutorTest, ReportsARefusedWriteAndKeepsTheRoundedOne) {
    const int tags[] = {2, 8};
    const int values[] = {1500000, 600000};  // a cap between steps; kHz in an Hz node
    EXPECT_EQ(-1, mExecutor->doPerfSetConfig(1, 2, tags, values));
    EXPECT_EQ("1497600", node("cpu.little.max"));
    EXPECT_EQ("900000000", node("gpu.max"));
    const auto notes = mTimeline.instants("device");
    ASSERT_EQ(2u, notes.size());
    EXPECT_EQ("cpu.little.max requested 1500000, effective 1497600", notes[0].name);
    EXPECT_EQ("gpu.max refused 600000: 600000 is below the lowest frequency 257000000 Hz",
              notes[1].name);
}

class HostExecutorPaced : public HostExecutorTest {
protected:
    void setClock() override { mClock.setPaced(50.0); }  // 1000 trace ms in 20 real ms
};

TEST_F(HostExecutorPaced, RevertsAtItsTraceTimeAfterTheWallClockGetsThere) {
    mClock.restart();  // the pacing counts from here, not from the fixture's set-up
    const auto start = std::chrono::steady_clock::now();
    ASSERT_EQ(0, apply(action(4099, 1000, {7, 500000000}), 0));
    mClock.advanceTo(999);
    EXPECT_EQ("500000000", node("gpu.min"));
    mClock.advanceTo(1000);
    EXPECT_EQ("257000000", node("gpu.min"));
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(19));
    // An interrupt stops the advance under way where the wall clock has got to, and pacing
    // for good: the next trace minute passes without waiting for it.
    mClock.interrupt();
    mClock.advanceTo(100000);
    EXPECT_LT(mClock.nowMs(), 100000);
    const auto interrupted = std::chrono::steady_clock::now();
    mClock.advanceTo(100000);
    EXPECT_EQ(100000, mClock.nowMs());
    EXPECT_LT(std::chrono::steady_clock::now() - interrupted, std::chrono::seconds(1));
}

}  // namespace
}  // namespace velmora
