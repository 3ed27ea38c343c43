// SchedLevelManager on its own: defaults, duration-0 events, the merge, client requests and
// rollback, observed at the recording executor, the log and the returned status.
#include "sched/SchedLevelManager.h"

#include <gtest/gtest.h>

#include <chrono>
#include <future>
#include <string>
#include <vector>

#include "platform/VelmoraPlat.h"
#include "tests/fakes/FakeExecutor.h"
#include "tests/fakes/LogCapture.h"
#include "tests/sched/SchedTestHelpers.h"

namespace velmora {
namespace fake {
namespace {

using LevelMap = SchedLevelManager::LevelMap;

constexpr int kFailed = 7;  // an executor result that is neither 0 nor -1
const char* const kSendFailed = "doSchedLevelAction failed!";

// Every table and flag, copied under the manager's lock.
struct Tables {
    LevelMap defaults, current, kx, jn, zola, zolaFirst, zolaEvent;
    bool zolaFirstSeen;
    bool hmp;
    bool operator==(const Tables& o) const {
        return defaults == o.defaults && current == o.current && kx == o.kx && jn == o.jn &&
               zola == o.zola && zolaFirst == o.zolaFirst && zolaEvent == o.zolaEvent &&
               zolaFirstSeen == o.zolaFirstSeen && hmp == o.hmp;
    }
};

// All nine tags at `level`, with `overrides` on top.
LevelMap allGroups(int level, const LevelMap& overrides = {}) {
    LevelMap table;
    for (int tag = 50; tag <= 58; ++tag) {
        table[tag] = level;
    }
    for (const auto& entry : overrides) {
        table[entry.first] = entry.second;
    }
    return table;
}

class SchedLevelManagerTest : public ::testing::Test {
protected:
    void SetUp() override {
        LogCapture::start();
        mPlat.mExecutorPtr = &mExecutor;
    }

    Tables snapshot() {
        android::Mutex::Autolock lock(mManager.mLock);
        return {
            mManager.mDefaultLevelMap, mManager.mCurrentLevelMap,    mManager.mKxLevelMap,
            mManager.mJnLevelMap,      mManager.mZolaLevelMap,       mManager.mZolaFirstEventMap,
            mManager.mZolaEventMap,    mManager.mZolaFirstEventSeen, mManager.mHmpMode};
    }

    int event(int cmdId, const std::vector<int>& pairs) {
        const Action action = schedEvent(cmdId, pairs);
        return mManager.doEventSchedLevel(&action);
    }

    // Installs EAS defaults at `level` and forgets what that logged or sent.
    void easDefaults(int level = 0) {
        ASSERT_EQ(event(5376, easPairs(level)), 0);
        mExecutor.clear();
        LogCapture::clear();
    }

    int request(int clientId, const std::vector<int>& tags, const std::vector<int>& configs) {
        return mManager.doPerfSetSchedLevel(clientId, static_cast<int>(tags.size()), tags.data(),
                                            configs.data());
    }

    // Groups and levels of the only doSchedLevelAction call so far, as one table.
    LevelMap onlySent() {
        const auto calls = mExecutor.calls(Op::SchedLevel);
        EXPECT_EQ(calls.size(), 1u);
        LevelMap sent;
        if (calls.empty()) {
            return sent;
        }
        EXPECT_EQ(calls[0].tags.size(), calls[0].values.size());
        for (size_t i = 0; i < calls[0].tags.size(); ++i) {
            sent[calls[0].tags[i]] = calls[0].values[i];
        }
        return sent;
    }

    size_t sendCount() { return mExecutor.calls(Op::SchedLevel).size(); }

    FakeExecutor mExecutor;
    VelmoraPlat mPlat;
    SchedLevelManager mManager{&mPlat};
};

// ---- Decoding of client values and the level scale ----

struct DecodeRow {
    int config;
    int group;  // getSchedGroup
    int level;  // getSchedLevel
};

class SchedDecodeTest : public SchedLevelManagerTest,
                        public ::testing::WithParamInterface<DecodeRow> {};

TEST_P(SchedDecodeTest, DecodesPackedValue) {
    EXPECT_EQ(mManager.getSchedGroup(GetParam().config), GetParam().group);
    EXPECT_EQ(mManager.getSchedLevel(GetParam().config), GetParam().level);
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, SchedDecodeTest,
    ::testing::Values(DecodeRow{3 * 65536 + 10, 3, -10},  // top-app at -10
                      DecodeRow{3 * 65536 + 0, 3, -20},   // bottom of the scale
                      DecodeRow{3 * 65536 + 60, 3, 40},   // top of the scale
                      DecodeRow{3 * 65536 + 61, 3, -1},   // above the scale
                      DecodeRow{3 * 65536 + 19, 3, -1},   // level -1 looks like the error
                      DecodeRow{3 * 65536 + 45, 3, 25},   // in range but off the scale
                      DecodeRow{8 * 65536 + 20, 8, 0},    // last group index
                      DecodeRow{9 * 65536 + 20, -1, 0},   // group index 9
                      DecodeRow{-1, -1, -1},              // negative: upper half 0xFFFF
                      DecodeRow{0, 0, -20}));             // hmp group index

TEST_F(SchedLevelManagerTest, IndexOnTheScale) {
    EXPECT_EQ(mManager.getIndex(-20), 0);
    // clang-format on
    EXPECT_EQ(mManager.getIndex(0), 2);
    EXPECT_EQ(mManager.getIndex(40), 6);
    EXPECT_EQ(mManager.getIndex(5), -1);
    EXPECT_EQ(mManager.getIndex(-100), -1);
}

// ---- Defaults (command 5376) ----

TEST_F(SchedLevelManagerTest, EasDefaultsAreRecordedWithoutCallingThePlatform) {
    std::vector<int> pairs = easPairs(10);
    pairs[5] = -10;  // tag 53
    EXPECT_EQ(event(5376, pairs), 0);
    EXPECT_EQ(sendCount(), 0u);

    const Tables t = snapshot();
    const LevelMap expected = allGroups(10, {{50, 0}, {53, -10}});
    EXPECT_EQ(t.defaults, expected);
    EXPECT_EQ(t.current, expected);
    EXPECT_EQ(t.kx, expected);
    EXPECT_EQ(t.jn, expected);
    EXPECT_EQ(t.zola, expected);
    EXPECT_EQ(t.zolaEvent, allGroups(ZOLA_SCHED_LEVEL_NONE));
    EXPECT_EQ(t.zolaFirst, allGroups(ZOLA_SCHED_LEVEL_NONE));
    EXPECT_FALSE(t.hmp);
}

TEST_F(SchedLevelManagerTest, DefaultLevelsAreNotRangeChecked) {
    std::vector<int> pairs = easPairs(0);
    pairs[1] = 99;
    EXPECT_EQ(event(5376, pairs), 0);
    EXPECT_EQ(snapshot().defaults[51], 99);
}

TEST_F(SchedLevelManagerTest, EightPairsOfOneTagChangeOnlyThatGroup) {
    std::vector<int> pairs;
    for (int i = 0; i < 8; ++i) {
        pairs.insert(pairs.end(), {51, 10 + i});
    }
    EXPECT_EQ(event(5376, pairs), 0);
    EXPECT_EQ(snapshot().defaults, allGroups(0, {{51, 17}}));  // the last pair wins
}

TEST_F(SchedLevelManagerTest, HmpDefaultSwitchesToTheSingleGroup) {
    ASSERT_EQ(event(5376, {50, 10}), 0);
    EXPECT_TRUE(snapshot().hmp);

    EXPECT_EQ(event(4500, {50, 20}), 0);
    const auto calls = mExecutor.calls(Op::SchedLevel);
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].tags, std::vector<int>({50}));
    EXPECT_EQ(calls[0].values, std::vector<int>({20}));

    // Back to EAS with the next full set.
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

// ---- Rejected events: nothing changes, nothing is sent ----

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

std::vector<int> withPair(std::vector<int> pairs, size_t index, int tag) {
    pairs[2 * index] = tag;
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
                         "cmdId(4500) (duration=0): 2 pairs announced, 2 values given"},
        // Defaults: a single pair must be the hmp group.
        RejectedEventRow{"DefaultsOneEasPair", 5376, {51, 0}, -1, ANDROID_LOG_ERROR,
                         "init default group failed! tagLen must be (eas:8, hmp:1)"},
        RejectedEventRow{"DefaultsThreePairs", 5376, {51, 0, 52, 0, 53, 0}, -1,
                         ANDROID_LOG_ERROR,
                         "init default group failed! tagLen must be (eas:8, hmp:1)"},
        // The group message reports the group index, not the tag.
        RejectedEventRow{"DefaultsHmpAmongEight", 5376, withPair(easPairs(0), 3, 50), -1,
                         ANDROID_LOG_ERROR, "invalid eas group, group tag is 0"},
        RejectedEventRow{"DefaultsNinePairs", 5376, nineEasPairs(), -1, ANDROID_LOG_DEBUG,
                         "cmdId(5376) (duration=0): group num is invalid, max group num is 8!"}),
    [](const ::testing::TestParamInfo<RejectedEventRow>& info) { return info.param.name; });
// clang-format on

TEST_F(SchedLevelManagerTest, NullActionIsRejected) {
    EXPECT_EQ(mManager.doEventSchedLevel(nullptr), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "doEventSchedLevel failed, action is NULL!"));
}

// ---- Events feed the ZOLA source ----

TEST_F(SchedLevelManagerTest, FirstEventSendsAllEasGroupsWithUnnamedOnesUnset) {
    easDefaults();
    EXPECT_EQ(event(4500, {53, 20}), 0);
    const auto calls = mExecutor.calls(Op::SchedLevel);
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].tags, std::vector<int>({51, 52, 53, 54, 55, 56, 57, 58}));
    EXPECT_EQ(calls[0].values, std::vector<int>({-100, -100, 20, -100, -100, -100, -100, -100}));
    EXPECT_EQ(snapshot().zola, allGroups(ZOLA_SCHED_LEVEL_NONE, {{53, 20}}));
}

TEST_F(SchedLevelManagerTest, EventThatChangesNoZolaLevelCallsNoPlatform) {
    easDefaults();
    ASSERT_EQ(event(4500, {53, 20}), 0);
    mExecutor.clear();
    EXPECT_EQ(event(4501, {53, 20, 54, -100}), 0);
    EXPECT_EQ(sendCount(), 0u);
}

TEST_F(SchedLevelManagerTest, LaterPairForTheSameGroupWins) {
    easDefaults();
    EXPECT_EQ(event(4500, {53, 20, 53, 30}), 0);
    EXPECT_EQ(onlySent()[53], 30);
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

    EXPECT_EQ(event(4501, {53, 30}), 0);
    EXPECT_EQ(onlySent(), easLevels(ZOLA_SCHED_LEVEL_NONE, {{53, 30}}));
}

TEST_F(SchedLevelManagerTest, FollowerOnlyMovesGroupsStillAtTheFirstReferenceLevels) {
    easDefaults();
    ASSERT_EQ(event(4114, {53, 20}), 0);  // kept as the reference
    ASSERT_EQ(event(4500, {54, 30}), 0);  // another event moves 54 meanwhile
    mExecutor.clear();

    // 53 is still what the first 4114 set, 55 still unset in both: both move. 54 stays.
    EXPECT_EQ(event(4113, {53, 0, 54, 0, 55, 10}), 0);
    EXPECT_EQ(onlySent(), easLevels(ZOLA_SCHED_LEVEL_NONE, {{53, 0}, {54, 30}, {55, 10}}));
}

TEST_F(SchedLevelManagerTest, OnlyTheFirstReferenceEventIsKept) {
    easDefaults();
    ASSERT_EQ(event(4114, {53, 20}), 0);
    ASSERT_EQ(event(4114, {53, 30}), 0);
    EXPECT_EQ(snapshot().zolaFirst, allGroups(ZOLA_SCHED_LEVEL_NONE, {{53, 20}}));
    mExecutor.clear();

    // 53 now holds the second 4114's level, so 4113 has nothing to move.
    EXPECT_EQ(event(4113, {53, 0}), 0);
    EXPECT_EQ(sendCount(), 0u);
    EXPECT_EQ(snapshot().zola[53], 30);
}

TEST_F(SchedLevelManagerTest, FollowerBeforeAnyReferenceWritesUnsetGroups) {
    easDefaults();
    EXPECT_EQ(event(4113, {53, 10}), 0);
    EXPECT_EQ(onlySent()[53], 10);
    EXPECT_FALSE(snapshot().zolaFirstSeen);
}

// ---- The merge ----

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

// ---- Platform failures roll an event back ----

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

TEST_F(SchedLevelManagerTest, EventWithoutExecutorIsRolledBack) {
    easDefaults();
    const Tables before = snapshot();
    mPlat.mExecutorPtr = nullptr;
    EXPECT_EQ(event(4500, {53, 20}), -1);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, kSendFailed), 2);
    EXPECT_TRUE(snapshot() == before);
}

// ---- Client requests ----

TEST_F(SchedLevelManagerTest, ClientLowersAGroupBelowItsDefault) {
    easDefaults();
    EXPECT_EQ(request(1, {42}, {packLevel(3, -10)}), 0);
    EXPECT_EQ(onlySent(), easLevels(0, {{53, -10}}));
    EXPECT_EQ(*mManager.getSchedLevelMap(1), allGroups(0, {{53, -10}}));
}

TEST_F(SchedLevelManagerTest, ClientAboveTheDefaultLeavesTheGroupToZola) {
    easDefaults();
    EXPECT_EQ(request(1, {42, 42}, {packLevel(3, 40), packLevel(4, 25)}), 0);
    EXPECT_EQ(onlySent(), easLevels(0));
    EXPECT_EQ(snapshot().kx, allGroups(0, {{53, 40}, {54, 25}}));
}

TEST_F(SchedLevelManagerTest, UnchangedRequestIsSentAgain) {
    easDefaults();
    ASSERT_EQ(request(2, {42}, {packLevel(3, -10)}), 0);
    ASSERT_EQ(request(2, {42}, {packLevel(3, -10)}), 0);
    EXPECT_EQ(sendCount(), 2u);
}

TEST_F(SchedLevelManagerTest, HmpIndexIsStoredInEasModeButNotSent) {
    easDefaults();
    EXPECT_EQ(request(1, {42}, {packLevel(0, -20)}), 0);
    EXPECT_EQ(onlySent(), easLevels(0));
    EXPECT_EQ(snapshot().kx[50], -20);
}

TEST_F(SchedLevelManagerTest, ResetRestoresTheDefaultsForAllGroups) {
    ASSERT_EQ(event(5376, {50, 10}), 0);  // hmp: group 50 only
    ASSERT_EQ(request(1, {42, 42}, {packLevel(0, -20), packLevel(5, -10)}), 0);
    mExecutor.clear();

    EXPECT_EQ(request(1, {40}, {0}), 0);
    EXPECT_EQ(snapshot().kx, allGroups(0, {{50, 10}}));
    const auto calls = mExecutor.calls(Op::SchedLevel);
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].tags, std::vector<int>({50}));
    // ZOLA holds the defaults, so the reset group follows the default.
    EXPECT_EQ(calls[0].values, std::vector<int>({10}));
}

TEST_F(SchedLevelManagerTest, StepsMoveTheWholeClientTable) {
    easDefaults(20);
    ASSERT_EQ(request(2, {42}, {packLevel(3, -20)}), 0);
    mExecutor.clear();

    EXPECT_EQ(request(2, {40}, {2}), 0);  // up: 53 -20 -> -10, the rest stays at the default
    EXPECT_EQ(snapshot().jn, allGroups(20, {{50, 0}, {53, -10}}));
    EXPECT_EQ(onlySent(), easLevels(20, {{53, -10}}));

    mExecutor.clear();
    EXPECT_EQ(request(2, {40}, {1}), 0);  // down: every group one step
    EXPECT_EQ(snapshot().jn, allGroups(10, {{50, -10}, {53, -20}}));
    EXPECT_EQ(onlySent(), easLevels(10, {{53, -20}}));
}

struct StepRow {
    const char* name;
    int defaultLevel, start, step;
    int expected;
};

class SchedStepTest : public SchedLevelManagerTest,
                      public ::testing::WithParamInterface<StepRow> {};

TEST_P(SchedStepTest, MovesOneStepCappedByTheDefault) {
    const StepRow& row = GetParam();
    android::Mutex::Autolock lock(mManager.mLock);
    mManager.mDefaultLevelMap[53] = row.defaultLevel;
    LevelMap table = allGroups(0, {{53, row.start}});
    mManager.updateSchedLevelByOneStep(table, row.step);
    EXPECT_EQ(table[53], row.expected);
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, SchedStepTest,
    ::testing::Values(StepRow{"UpToTheDefault", 0, 40, +1, 0},
                      StepRow{"UpBelowTheDefault", 20, -10, +1, 0},
                      StepRow{"UpStopsAtTheTop", 40, 40, +1, 40},
                      StepRow{"DownStopsAtTheBottom", 0, -20, -1, -20},
                      StepRow{"DownFromAboveTheDefault", 0, 30, -1, 0},
                      StepRow{"UnsetGoesToTheBottom", 0, -100, +1, -20},
                      StepRow{"OffScaleUpGoesToTheBottom", 0, 25, +1, -20},
                      StepRow{"OffScaleDownGoesToTheBottom", 0, 25, -1, -20}),
    [](const ::testing::TestParamInfo<StepRow>& info) { return info.param.name; });
// clang-format on

TEST_F(SchedLevelManagerTest, PairsBeforeABadValueStayAndAreSentLater) {
    easDefaults();
    EXPECT_EQ(request(1, {42, 42}, {packLevel(3, -10), 4 * 65536 + 19}), -1);
    EXPECT_EQ(sendCount(), 0u);
    EXPECT_EQ(snapshot().kx[53], -10);
    EXPECT_EQ(snapshot().current[53], 0);

    EXPECT_EQ(request(1, {42}, {packLevel(5, -20)}), 0);
    EXPECT_EQ(onlySent(), easLevels(0, {{53, -10}, {55, -20}}));
}

TEST_F(SchedLevelManagerTest, InvalidClientIdTakesNoLock) {
    mManager.mLock.lock();
    auto pending = std::async(std::launch::async, [this] { return request(4, {42}, {20}); });
    const bool finished = pending.wait_for(std::chrono::seconds(5)) == std::future_status::ready;
    mManager.mLock.unlock();
    EXPECT_TRUE(finished);
    EXPECT_EQ(pending.get(), -1);
    EXPECT_EQ(mManager.getSchedLevelMap(4), nullptr);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "invalid clientId is 4"), 2);
}

// ---- Rejected client requests ----

enum class KxAfter { Untouched, Top53AtMinus10 };

struct RejectedRequestRow {
    const char* name;
    int clientId;
    std::vector<int> tags;
    std::vector<int> configs;
    int prio;
    std::string log;
    KxAfter kxAfter;
};

class SchedRejectedRequestTest : public SchedLevelManagerTest,
                                 public ::testing::WithParamInterface<RejectedRequestRow> {};

TEST_P(SchedRejectedRequestTest, IsRejectedAndSendsNothing) {
    const RejectedRequestRow& row = GetParam();
    easDefaults();
    ASSERT_EQ(request(1, {42}, {packLevel(4, -20)}), 0);
    mExecutor.clear();
    LogCapture::clear();
    const Tables before = snapshot();

    EXPECT_EQ(request(row.clientId, row.tags, row.configs), -1);
    EXPECT_EQ(LogCapture::count(row.prio, row.log), 1) << row.log;
    EXPECT_EQ(sendCount(), 0u);
    const Tables after = snapshot();
    EXPECT_EQ(after.current, before.current);
    EXPECT_EQ(after.jn, before.jn);
    EXPECT_EQ(after.zola, before.zola);
    LevelMap kx = before.kx;
    if (row.kxAfter == KxAfter::Top53AtMinus10) {
        kx[53] = -10;
    }
    EXPECT_EQ(after.kx, kx);
}

std::vector<int> repeated(int value, int n) {
    return std::vector<int>(static_cast<size_t>(n), value);
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, SchedRejectedRequestTest,
    ::testing::Values(
        RejectedRequestRow{"FeatureSwitchChannel", 0, {42}, {packLevel(3, 0)}, ANDROID_LOG_ERROR,
                           "invalid clientId is 0", KxAfter::Untouched},
        RejectedRequestRow{"UnknownClient", 4, {42}, {packLevel(3, 0)}, ANDROID_LOG_ERROR,
                           "invalid clientId is 4", KxAfter::Untouched},
        RejectedRequestRow{"StepConfig3", 1, {40}, {3}, ANDROID_LOG_ERROR,
                           "invalid sched Level config is 3, clientId(1)", KxAfter::Untouched},
        RejectedRequestRow{"StepConfigNegative", 1, {40}, {-1}, ANDROID_LOG_ERROR,
                           "invalid sched Level config is -1, clientId(1)", KxAfter::Untouched},
        RejectedRequestRow{"NoTags", 1, {}, {}, ANDROID_LOG_DEBUG,
                           "invalid sched level argument, clientId is 1", KxAfter::Untouched},
        RejectedRequestRow{"NineTags", 1, repeated(42, 9), repeated(packLevel(3, 0), 9),
                           ANDROID_LOG_DEBUG, "invalid sched level argument, clientId is 1",
                           KxAfter::Untouched},
        // The stored first pair is taken back.
        RejectedRequestRow{"StepAfterSet", 1, {42, 40}, {packLevel(3, -10), 2},
                           ANDROID_LOG_DEBUG,
                           "do not use VELMORA_TAG_SET_SCHED_LEVEL with other tags(40), "
                           "clientId is 1",
                           KxAfter::Untouched},
        RejectedRequestRow{"StepAmongTags", 1, {40, 42}, {2, packLevel(3, -10)},
                           ANDROID_LOG_DEBUG,
                           "do not use VELMORA_TAG_SET_SCHED_LEVEL with other tags(40), "
                           "clientId is 1",
                           KxAfter::Untouched},
        RejectedRequestRow{"FrequencyTagAfterSet", 1, {42, 22}, {packLevel(3, -10), 1000},
                           ANDROID_LOG_DEBUG,
                           "do not use VELMORA_TAG_SET_SCHED_LEVEL with other tags(22), "
                           "clientId is 1",
                           KxAfter::Untouched},
        RejectedRequestRow{"GroupIndex9", 1, {42}, {9 * 65536 + 20}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(589844), clientId(1)", KxAfter::Untouched},
        RejectedRequestRow{"LevelMinus1", 1, {42}, {3 * 65536 + 19}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(196627), clientId(1)", KxAfter::Untouched},
        RejectedRequestRow{"LevelAbove40", 1, {42}, {3 * 65536 + 61}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(196669), clientId(1)", KxAfter::Untouched},
        RejectedRequestRow{"NegativeValue", 1, {42}, {-1}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(-1), clientId(1)", KxAfter::Untouched},
        // No rollback on a bad value: the first pair stays stored.
        RejectedRequestRow{"BadValueAfterGoodPair", 1, {42, 42},
                           {packLevel(3, -10), 3 * 65536 + 61}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(196669), clientId(1)", KxAfter::Top53AtMinus10}),
    [](const ::testing::TestParamInfo<RejectedRequestRow>& info) { return info.param.name; });
// clang-format on

TEST_F(SchedLevelManagerTest, FailedRequestIsRolledBackAndLoggedTwice) {
    easDefaults();
    ASSERT_EQ(request(1, {42}, {packLevel(4, -20)}), 0);
    const Tables before = snapshot();
    mExecutor.setResult(Op::SchedLevel, kFailed);

    EXPECT_EQ(request(1, {42, 42}, {packLevel(3, -10), packLevel(4, 0)}), kFailed);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, kSendFailed), 2);
    EXPECT_TRUE(snapshot() == before);
}

TEST_F(SchedLevelManagerTest, FailedStepIsRolledBack) {
    easDefaults(20);
    const Tables before = snapshot();
    mPlat.mExecutorPtr = nullptr;
    EXPECT_EQ(request(3, {40}, {1}), -1);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, kSendFailed), 2);
    EXPECT_TRUE(snapshot() == before);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
