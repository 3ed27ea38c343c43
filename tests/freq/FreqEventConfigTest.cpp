// FreqClientManager's event path: floors and caps of on/off commands merged with each other and
// with the clients, switch-off, the floor-above-cap check and invalid tags.
#include "freq/FreqClientManager.h"

#include "tests/freq/FreqManagerFixture.h"

namespace velmora {
namespace fake {
namespace {

constexpr int kLMin = VELMORA_TAG_LITTLE_CPU_MIN_FREQ;
constexpr int kLMax = VELMORA_TAG_LITTLE_CPU_MAX_FREQ;
constexpr int kBMin = VELMORA_TAG_BIG_CPU_MIN_FREQ;
constexpr int kBMax = VELMORA_TAG_BIG_CPU_MAX_FREQ;
constexpr int kGMin = VELMORA_TAG_GPU_MIN_FREQ;
constexpr int kGMax = VELMORA_TAG_GPU_MAX_FREQ;
constexpr int kA = 12288;
constexpr int kB = 12300;
constexpr int kC = 13568;

using EventMap = FreqClientManager::EventMap;

TEST_F(FreqManagerTest, CapsOfSeveralEventsTakeTheSmallest) {
    ASSERT_EQ(event(kA, kOn, {{kLMax, 1500000}}), 0);
    EXPECT_EQ(lastSent(kA, {kLMax}), (Ints{1500000}));
    ASSERT_EQ(event(kB, kOn, {{kLMax, 1800000}}), 0);
    EXPECT_EQ(lastSent(kB, {kLMax}), (Ints{1500000}));
    // Switching A off tells the platform what remains: B's cap.
    ASSERT_EQ(event(kA, kOff, {{kLMax, 1500000}}), 0);
    EXPECT_EQ(lastSent(kA, {kLMax}), (Ints{1800000}));
    EXPECT_EQ(snapshot().littleMax, (EventMap{{kA, 0}, {kB, 1800000}}));
    // A second switch-on of the same event does not compare against its own old entry.
    ASSERT_EQ(event(kB, kOn, {{kLMax, 2000000}}), 0);
    EXPECT_EQ(lastSent(kB, {kLMax}), (Ints{2000000}));
    ASSERT_EQ(event(kB, kOff, {{kLMax, 2000000}}), 0);
    EXPECT_EQ(lastSent(kB, {kLMax}), (Ints{0}));
}

TEST_F(FreqManagerTest, EventCapsRespectTheClientsMergedCap) {
    ASSERT_EQ(client(1, {{kLMax, 1200000}}), 0);
    ASSERT_EQ(event(kA, kOn, {{kLMax, 1500000}}), 0);
    EXPECT_EQ(lastSent(kA, {kLMax}), (Ints{1200000}));
    ASSERT_EQ(event(kA, kOff, {{kLMax, 1500000}}), 0);
    EXPECT_EQ(lastSent(kA, {kLMax}), (Ints{1200000}));
    // The event's own table entry is its request, not the merged value.
    EXPECT_EQ(snapshot().littleMax, (EventMap{{kA, 0}}));
}

TEST_F(FreqManagerTest, FloorsOfSeveralEventsTakeTheLargest) {
    ASSERT_EQ(event(kA, kOn, {{kBMin, 1000000}}), 0);
    ASSERT_EQ(event(kB, kOn, {{kBMin, 1200000}}), 0);
    EXPECT_EQ(lastSent(kB, {kBMin}), (Ints{1200000}));
    ASSERT_EQ(event(kA, kOn, {{kBMin, 900000}}), 0);
    EXPECT_EQ(lastSent(kA, {kBMin}), (Ints{1200000}));
    ASSERT_EQ(event(kB, kOff, {{kBMin, 1200000}}), 0);
    EXPECT_EQ(lastSent(kB, {kBMin}), (Ints{900000}));
    ASSERT_EQ(event(kA, kOff, {{kBMin, 900000}}), 0);
    EXPECT_EQ(lastSent(kA, {kBMin}), (Ints{0}));
    EXPECT_EQ(snapshot().bigMin, (EventMap{{kA, 0}, {kB, 0}}));
}

TEST_F(FreqManagerTest, MixedRequestIsSentInRequestOrderWithTheCallersTags) {
    ASSERT_EQ(event(kA, kOn, {{kGMax, 700000}, {kLMin, 500000}, {kBMax, 1900000}}), 0);
    EXPECT_EQ(lastSent(kA, {kGMax, kLMin, kBMax}), (Ints{700000, 500000, 1900000}));
    const Snapshot s = snapshot();
    EXPECT_EQ(s.gpuMax, (EventMap{{kA, 700000}}));
    EXPECT_EQ(s.littleMin, (EventMap{{kA, 500000}}));
    EXPECT_EQ(s.bigMax, (EventMap{{kA, 1900000}}));
    EXPECT_TRUE(s.gpuMin.empty());
    EXPECT_EQ(s.kx.at(kGMax), -1);  // events never touch the client tables
}

TEST_F(FreqManagerTest, FloorOfOneEventAboveCapOfAnotherIsRejected) {
    ASSERT_EQ(event(kB, kOn, {{kGMax, 500000}}), 0);
    EXPECT_EQ(event(kA, kOn, {{kGMin, 600000}, {kGMax, 900000}}), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO,
                                "freq is invalid(min > freq), cmdId is 12288, (l_cpu(0,0), "
                                "b_cpu(0, 0), gpu(600000, 500000))"));
    EXPECT_EQ(setCalls().size(), 1u);
}

TEST_F(FreqManagerTest, SwitchOffClearsEvenWhenTheRemainingLimitsConflict) {
    ASSERT_EQ(event(kC, kOn, {{kLMin, 500000}, {kLMax, 3000000}}), 0);
    ASSERT_EQ(event(kA, kOn, {{kLMin, 2000000}}), 0);
    ASSERT_EQ(event(kB, kOn, {{kLMax, 1000000}}), 0);
    mExec.clear();
    EXPECT_EQ(event(kC, kOff, {{kLMin, 500000}, {kLMax, 3000000}}), -1);
    EXPECT_TRUE(setCalls().empty());
    const Snapshot s = snapshot();
    EXPECT_EQ(s.littleMin.at(kC), 0);
    EXPECT_EQ(s.littleMax.at(kC), 0);
}

TEST_F(FreqManagerTest, EventCapOfZeroWinsAndIsNotStored) {
    ASSERT_EQ(event(kA, kOn, {{kLMax, 1500000}}), 0);
    ASSERT_EQ(event(kB, kOn, {{kLMax, 0}}), 0);
    EXPECT_EQ(lastSent(kB, {kLMax}), (Ints{0}));
    EXPECT_EQ(snapshot().littleMax, (EventMap{{kA, 1500000}}));
}

TEST_F(FreqManagerTest, PlatformFailureOfAnEventIsReturnedAfterStoring) {
    mExec.setResult(Op::SetConfig, 6);
    EXPECT_EQ(event(kA, kOn, {{kBMax, 1500000}}), 6);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "doPerfSetConfig failed!"));
    EXPECT_EQ(snapshot().bigMax, (EventMap{{kA, 1500000}}));
    mPlat.mExecutorPtr = nullptr;
    EXPECT_EQ(event(kA, kOff, {{kBMax, 1500000}}), -1);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "doPerfSetConfig failed!"), 2);
    EXPECT_EQ(snapshot().bigMax, (EventMap{{kA, 0}}));
}

TEST_F(FreqManagerTest, TooManyEventTagsAreRefused) {
    Pairs pairs(MAX_EVENT_TAGS + 1, {kLMax, 1000000});
    EXPECT_EQ(event(kA, kOn, pairs), -1);
    EXPECT_TRUE(setCalls().empty());
    pairs.pop_back();
    EXPECT_EQ(event(kA, kOn, pairs), 0);
}

class FreqEventTagTest : public FreqManagerTest, public ::testing::WithParamInterface<int> {};

TEST_P(FreqEventTagTest, TagOutsideFloorsAndCapsRejectsTheWholeRequest) {
    const int tag = GetParam();
    EXPECT_EQ(event(kA, kOn, {{kLMax, 1000000}, {tag, 5}}), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR,
                                "invalid tag " + std::to_string(tag) + ", cmdId is 12288"));
    EXPECT_TRUE(setCalls().empty());
    EXPECT_TRUE(snapshot().littleMax.empty());
}

// 0, 3 and 6 lie between the event tags; 9 and up are client-only or unknown.
INSTANTIATE_TEST_SUITE_P(Tags, FreqEventTagTest,
                         ::testing::Values(0, 3, 6, 9, 17, 20, 10000, -1, -7));

}  // namespace
}  // namespace fake
}  // namespace velmora
