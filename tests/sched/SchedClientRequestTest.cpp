// Client requests to SchedLevelManager (tags 40 and 42): stored levels, steps, resets, rejected
// requests and what survives them, and rollback when the platform refuses.
#include <chrono>
#include <future>
#include <string>
#include <vector>

#include "tests/sched/SchedManagerFixture.h"

namespace velmora {
namespace fake {
namespace {

TEST_F(SchedLevelManagerTest, ClientAboveTheDefaultLeavesTheGroupToZola) {
    easDefaults();
    // Top of the scale, off the scale but in range, the last group index, and the hmp group,
    // stored in EAS mode but not sent.
    EXPECT_EQ(request(1, {42, 42, 42, 42},
                      {packLevel(3, 40), packLevel(4, 25), packLevel(8, 30), packLevel(0, -20)}),
              0);
    EXPECT_EQ(onlySent(), easLevels(0));
    EXPECT_EQ(snapshot().kx, allGroups(0, {{53, 40}, {54, 25}, {58, 30}, {50, -20}}));
}

TEST_F(SchedLevelManagerTest, UnchangedRequestIsSentAgain) {
    easDefaults();
    ASSERT_EQ(request(2, {42}, {packLevel(3, -10)}), 0);
    ASSERT_EQ(request(2, {42}, {packLevel(3, -10)}), 0);
    EXPECT_EQ(sendCount(), 2u);
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

struct RejectedRequestRow {
    const char* name;
    int clientId;
    std::vector<int> tags;
    std::vector<int> configs;
    int prio;
    std::string log;
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
    EXPECT_TRUE(snapshot() == before);
}

std::vector<int> repeated(int value, int n) {
    return std::vector<int>(static_cast<size_t>(n), value);
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, SchedRejectedRequestTest,
    ::testing::Values(
        RejectedRequestRow{"FeatureSwitchChannel", 0, {42}, {packLevel(3, 0)}, ANDROID_LOG_ERROR,
                           "invalid clientId is 0"},
        RejectedRequestRow{"StepConfig3", 1, {40}, {3}, ANDROID_LOG_ERROR,
                           "invalid sched Level config is 3, clientId(1)"},
        RejectedRequestRow{"NoTags", 1, {}, {}, ANDROID_LOG_DEBUG,
                           "invalid sched level argument, clientId is 1"},
        RejectedRequestRow{"NineTags", 1, repeated(42, 9), repeated(packLevel(3, 0), 9),
                           ANDROID_LOG_DEBUG, "invalid sched level argument, clientId is 1"},
        // The stored first pair is taken back.
        RejectedRequestRow{"StepAfterSet", 1, {42, 40}, {packLevel(3, -10), 2},
                           ANDROID_LOG_DEBUG,
                           "do not use VELMORA_TAG_SET_SCHED_LEVEL with other tags(40), "
                           "clientId is 1"},
        RejectedRequestRow{"FrequencyTagAfterSet", 1, {42, 22}, {packLevel(3, -10), 1000},
                           ANDROID_LOG_DEBUG,
                           "do not use VELMORA_TAG_SET_SCHED_LEVEL with other tags(22), "
                           "clientId is 1"},
        RejectedRequestRow{"GroupIndex9", 1, {42}, {9 * 65536 + 20}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(589844), clientId(1)"},
        RejectedRequestRow{"LevelMinus1", 1, {42}, {3 * 65536 + 19}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(196627), clientId(1)"},
        RejectedRequestRow{"LevelAbove40", 1, {42}, {3 * 65536 + 61}, ANDROID_LOG_DEBUG,
                           "invalid sched Level(196669), clientId(1)"}),
    [](const ::testing::TestParamInfo<RejectedRequestRow>& info) { return info.param.name; });
// clang-format on

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
