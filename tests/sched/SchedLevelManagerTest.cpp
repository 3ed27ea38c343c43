// SchedLevelManager on its own: defaults, duration-0 events, the merge and the rollback of
// events the platform refuses, observed at the recording executor, the log and the status.
#include <string>
#include <vector>

#include "tests/sched/SchedManagerFixture.h"

namespace velmora {
namespace fake {
namespace {

TEST_F(SchedLevelManagerTest, EightPairsOfOneTagChangeOnlyThatGroup) {
    std::vector<int> pairs;
    for (int i = 0; i < 8; ++i) {
        pairs.insert(pairs.end(), {51, 10 + i});
    }
    EXPECT_EQ(event(5376, pairs), 0);
    EXPECT_EQ(snapshot().defaults, allGroups(0, {{51, 17}}));  // the last pair wins
}

TEST_F(SchedLevelManagerTest, FullEasSetAfterHmpDefaultsLeavesHmpMode) {
    ASSERT_EQ(event(5376, {50, 10}), 0);
    EXPECT_TRUE(snapshot().hmp);
    ASSERT_EQ(event(5376, easPairs(0)), 0);
    EXPECT_FALSE(snapshot().hmp);
}

TEST_F(SchedLevelManagerTest, RepeatedDefaultsDiscardClientRequests) {
    easDefaults();
    ASSERT_EQ(request(1, {42}, {packLevel(3, -10)}), 0);
    ASSERT_EQ(request(2, {42}, {packLevel(4, -20)}), 0);
    ASSERT_EQ(event(4500, {53, 20}), 0);

    ASSERT_EQ(event(5376, easPairs(0)), 0);
    const Tables t = snapshot();
    EXPECT_EQ(t.kx, allGroups(0));
    EXPECT_EQ(t.jn, allGroups(0));
    // Only the groups the defaults name: hmp keeps what the event copied in.
    EXPECT_EQ(t.zola, allGroups(0, {{50, ZOLA_SCHED_LEVEL_NONE}}));
    EXPECT_EQ(t.zolaEvent, allGroups(ZOLA_SCHED_LEVEL_NONE, {{53, 20}}));  // kept

    // The next event with any change copies every differing event level back.
    mExecutor.clear();
    ASSERT_EQ(event(4500, {54, 10}), 0);
    EXPECT_EQ(onlySent(), easLevels(ZOLA_SCHED_LEVEL_NONE, {{53, 20}, {54, 10}}));
}

struct RejectedEventRow {
    const char* name;
    int cmdId;
    std::vector<int> pairs;
    int paramNum;  // -1: the number of pairs
    int prio;
    std::string log;
};

class SchedRejectedEventTest : public SchedLevelManagerTest,
                               public ::testing::WithParamInterface<RejectedEventRow> {};

TEST_P(SchedRejectedEventTest, IsRejectedWithoutSideEffects) {
    const RejectedEventRow& row = GetParam();
    easDefaults(10);
    ASSERT_EQ(event(4500, {53, 20}), 0);
    mExecutor.clear();
    const Tables before = snapshot();

    Action action = schedEvent(row.cmdId, row.pairs);
    if (row.paramNum >= 0) {
        action.mParamNum = row.paramNum;
    }
    EXPECT_EQ(mManager.doEventSchedLevel(&action), -1);
    EXPECT_EQ(LogCapture::count(row.prio, row.log), 1) << row.log;
    EXPECT_EQ(sendCount(), 0u);
    EXPECT_TRUE(snapshot() == before);
}

std::vector<int> nineEasPairs() {
    std::vector<int> pairs = easPairs(0);
    pairs.insert(pairs.end(), {51, 0});
    return pairs;
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, SchedRejectedEventTest,
    ::testing::Values(
        RejectedEventRow{"NoPairs", 4500, {}, -1, ANDROID_LOG_DEBUG,
                         "cmdId(4500) (duration=0): group num is invalid, max group num is 8!"},
        RejectedEventRow{"NinePairs", 4500, nineEasPairs(), -1, ANDROID_LOG_DEBUG,
                         "cmdId(4500) (duration=0): group num is invalid, max group num is 8!"},
        RejectedEventRow{"FrequencyTagAmongGroups", 4500, {53, 10, 42, 10}, -1,
                         ANDROID_LOG_DEBUG,
                         "cmdId(4500) (duration=0) does not support other tags except sched "
                         "level!"},
        RejectedEventRow{"TagBelowGroups", 4500, {49, 0}, -1, ANDROID_LOG_DEBUG,
                         "cmdId(4500) (duration=0) does not support other tags except sched "
                         "level!"},
        RejectedEventRow{"TagAboveGroups", 4500, {59, 0}, -1, ANDROID_LOG_DEBUG,
                         "cmdId(4500) (duration=0) does not support other tags except sched "
                         "level!"},
        // The count claims more pairs than the record holds.
        RejectedEventRow{"CountBeyondPairs", 4500, {53, 10}, 2, ANDROID_LOG_ERROR,
                         "cmdId(4500) (duration=0): 2 pairs announced, 2 values given"}),
    [](const ::testing::TestParamInfo<RejectedEventRow>& info) { return info.param.name; });
// clang-format on

TEST_F(SchedLevelManagerTest, NullActionIsRejected) {
    EXPECT_EQ(mManager.doEventSchedLevel(nullptr), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "doEventSchedLevel failed, action is NULL!"));
}

TEST_F(SchedLevelManagerTest, HmpGroupNamedInEasModeIsKeptButNotSent) {
    easDefaults();
    EXPECT_EQ(event(4500, {50, 20}), 0);
    EXPECT_EQ(onlySent(), easLevels(ZOLA_SCHED_LEVEL_NONE));
    EXPECT_EQ(snapshot().zola[50], 20);
}

TEST_F(SchedLevelManagerTest, EventOverwritesLevelsTheZolaClientSet) {
    easDefaults();
    ASSERT_EQ(event(4500, {53, 20}), 0);
    ASSERT_EQ(request(3, {42}, {packLevel(2, 10)}), 0);
    EXPECT_EQ(snapshot().zola[52], 10);
    mExecutor.clear();

    // Of two pairs for one group the later wins.
    EXPECT_EQ(event(4501, {53, 25, 53, 30}), 0);
    EXPECT_EQ(onlySent(), easLevels(ZOLA_SCHED_LEVEL_NONE, {{53, 30}}));
}

TEST_F(SchedLevelManagerTest, FollowerBeforeAnyReferenceWritesUnsetGroups) {
    easDefaults();
    EXPECT_EQ(event(4113, {53, 10}), 0);
    EXPECT_EQ(onlySent()[53], 10);
    EXPECT_FALSE(snapshot().zolaFirstSeen);
}

struct MergeRow {
    const char* name;
    int defaultLevel, kx, jn, zola;
    int expected;
};

class SchedMergeTest : public SchedLevelManagerTest,
                       public ::testing::WithParamInterface<MergeRow> {};

TEST_P(SchedMergeTest, MergesGroupLevels) {
    const MergeRow& row = GetParam();
    int ret;
    {
        android::Mutex::Autolock lock(mManager.mLock);
        mManager.mDefaultLevelMap[53] = row.defaultLevel;
        mManager.mKxLevelMap[53] = row.kx;
        mManager.mJnLevelMap[53] = row.jn;
        mManager.mZolaLevelMap[53] = row.zola;
        ret = mManager.updateCurrentSchedlevel();
    }
    EXPECT_EQ(ret, 0);
    EXPECT_EQ(onlySent()[53], row.expected);
    EXPECT_EQ(snapshot().current[53], row.expected);
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, SchedMergeTest,
    ::testing::Values(
        // KX and JN both lower: the lowest wins, ZOLA is ignored.
        MergeRow{"LowestClientWins", 0, -10, -20, 30, -20},
        // Even a lower ZOLA level is ignored once a client lowers the group.
        MergeRow{"ClientLowersZolaIgnored", 0, -10, 0, -20, -10},
        // Clients above the default have no say: ZOLA decides, upwards too.
        MergeRow{"ZolaRaisesAboveDefault", 0, 10, 10, 30, 30},
        MergeRow{"ZolaLowersBelowDefault", 10, 10, 10, -10, -10},
        MergeRow{"UnsetZolaPassesThrough", 0, 10, 10, -100, -100},
        MergeRow{"JnAloneLowers", 10, 20, 0, 40, 0}),
    [](const ::testing::TestParamInfo<MergeRow>& info) { return info.param.name; });
// clang-format on

TEST_F(SchedLevelManagerTest, DirectHandOverReportsFailureOnceAndKeepsTheMerge) {
    mExecutor.setResult(Op::SchedLevel, kFailed);
    int ret;
    {
        android::Mutex::Autolock lock(mManager.mLock);
        mManager.mZolaLevelMap[53] = 30;
        ret = mManager.updateCurrentSchedlevel();
    }
    EXPECT_EQ(ret, kFailed);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, kSendFailed), 1);
    EXPECT_EQ(snapshot().current[53], 30);
}

TEST_F(SchedLevelManagerTest, FailedEventIsRolledBackAndLoggedTwice) {
    easDefaults();
    ASSERT_EQ(event(4500, {53, 20}), 0);
    const Tables before = snapshot();
    mExecutor.setResult(Op::SchedLevel, kFailed);

    EXPECT_EQ(event(4501, {53, 30, 54, 10}), kFailed);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, kSendFailed), 2);
    EXPECT_TRUE(snapshot() == before);

    // Rolled back, so the same event counts as a change once the platform accepts it.
    mExecutor.setResult(Op::SchedLevel, 0);
    mExecutor.clear();
    EXPECT_EQ(event(4501, {53, 30, 54, 10}), 0);
    EXPECT_EQ(sendCount(), 1u);
}

TEST_F(SchedLevelManagerTest, FailedFirstReferenceEventStillCountsAsRecorded) {
    easDefaults();
    mExecutor.setResult(Op::SchedLevel, kFailed);
    ASSERT_EQ(event(4114, {53, 20}), kFailed);
    Tables t = snapshot();
    EXPECT_TRUE(t.zolaFirstSeen);
    EXPECT_EQ(t.zolaFirst[53], 20);
    EXPECT_EQ(t.zolaEvent[53], ZOLA_SCHED_LEVEL_NONE);

    // A second 4114 does not replace the reference, so 4113 finds 53 moved and skips it.
    mExecutor.setResult(Op::SchedLevel, 0);
    ASSERT_EQ(event(4114, {53, 30}), 0);
    mExecutor.clear();
    EXPECT_EQ(event(4113, {53, 0}), 0);
    EXPECT_EQ(sendCount(), 0u);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
