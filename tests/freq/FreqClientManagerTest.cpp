// FreqClientManager's client path: merge rules per tag, rejected requests and what they leave
// behind, the feature switch and the statistics it feeds.
#include "freq/FreqClientManager.h"

#include "tests/freq/FreqManagerFixture.h"
#include "tests/freq/FreqReportLines.h"

namespace velmora {
namespace fake {
namespace {

using Strings = std::vector<std::string>;

constexpr int kL = VELMORA_TAG_LITTLE_CPU_MAX_FREQ;
constexpr int kB = VELMORA_TAG_BIG_CPU_MAX_FREQ;
constexpr int kFork = VELMORA_TAG_FORK_ON_BIG_CLUSTER;
constexpr int kIpaSwitch = VELMORA_TAG_IPA_SWITCH_TEMP;

TEST_F(FreqManagerTest, WithdrawnCapSendsZeroUnlessAnEventCaps) {
    ASSERT_EQ(client(1, {{kB, 0}, {kIpaSwitch, 0}}), 0);
    EXPECT_EQ(lastSent(1, {kB, kIpaSwitch}), (Ints{0, 0}));
    ASSERT_EQ(event(12288, kOn, {{kB, 1500000}}), 0);
    ASSERT_EQ(client(1, {{kB, 0}, {kB, 1800000}, {kB, 1200000}}), 0);
    EXPECT_EQ(lastSent(1, {kB, kB, kB}), (Ints{1500000, 1500000, 1200000}));
    EXPECT_EQ(snapshot().kx.at(kB), 1200000);  // the last copy is kept
}

// 1 is the smallest value that caps, for another client's request and for an event's.
TEST_F(FreqManagerTest, CapOfOneIsACapLikeAnyOther) {
    ASSERT_EQ(client(1, {{kL, 1}}), 0);
    ASSERT_EQ(client(2, {{kL, 5}}), 0);
    EXPECT_EQ(lastSent(2, {kL}), (Ints{1}));
    ASSERT_EQ(event(12288, kOn, {{kL, 1500000}}), 0);
    EXPECT_EQ(lastSent(12288, {kL}), (Ints{1}));
}

TEST_F(FreqManagerTest, ThermalTagsTakeTheSmallestPositiveButNoEventCap) {
    ASSERT_EQ(client(3, {{kIpaSwitch, 70000}}), 0);
    ASSERT_EQ(client(1, {{kIpaSwitch, 80000}}), 0);
    EXPECT_EQ(lastSent(1, {kIpaSwitch}), (Ints{70000}));
    ASSERT_EQ(client(2, {{kIpaSwitch, 60000}}), 0);
    EXPECT_EQ(lastSent(2, {kIpaSwitch}), (Ints{60000}));
}

TEST_F(FreqManagerTest, ForkOnBigClusterIsOffWhenAnyClientSaysSo) {
    ASSERT_EQ(client(1, {{kFork, 1}}), 0);
    EXPECT_EQ(lastSent(1, {kFork}), (Ints{1}));
    ASSERT_EQ(client(2, {{kFork, 0}}), 0);
    EXPECT_EQ(lastSent(2, {kFork}), (Ints{0}));
    ASSERT_EQ(client(3, {{kFork, 1}}), 0);
    EXPECT_EQ(lastSent(3, {kFork}), (Ints{0}));
}

TEST_F(FreqManagerTest, InvalidForkValueIsRejectedAndPoisonsTheMergedValue) {
    EXPECT_EQ(client(1, {{kL, 1500000}, {kFork, 2}}), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "invalid config(2), tag is 20"));
    EXPECT_TRUE(setCalls().empty());
    const Snapshot s = snapshot();
    EXPECT_EQ(s.min.at(kFork), -1);
    EXPECT_EQ(s.min.at(kL), 1500000);  // merged before the failure and kept
    EXPECT_EQ(s.kx.at(kL), -1);
}

TEST_F(FreqManagerTest, UnmergedTagsPassThroughUnrecorded) {
    ASSERT_EQ(client(1, {{VELMORA_TAG_LITTLE_CPU_MIN_FREQ, 1400000}, {3, 7}, {0, 0}}), 0);
    EXPECT_EQ(lastSent(1, {1, 3, 0}), (Ints{1400000, 7, 0}));
    const Snapshot s = snapshot();
    EXPECT_EQ(s.kx.count(1), 0u);
    EXPECT_EQ(s.kx.count(3), 0u);
    EXPECT_TRUE(s.littleMin.empty());  // client floors never reach the event tables
}

TEST_F(FreqManagerTest, RequestWithoutATableIsAppliedButNotRecorded) {
    EXPECT_EQ(client(-5, {{kL, 1000000}, {kB, 900000}, {3, 1}}), 0);
    EXPECT_EQ(lastSent(-5, {kL, kB, 3}), (Ints{1000000, 900000, 1}));
    // Once per merged tag, then once when recording.
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "invalid clientId is -5"), 3);
    EXPECT_EQ(snapshot().min.at(kL), 1000000);
}

struct RejectRow {
    const char* name;
    bool executor;       // platform has an executor
    int platformResult;  // what its set-config answers
    Pairs pairs;
    int expected;
    const char* log;  // error line expected
    bool reachesPlatform;
};

class FreqClientRejectTest : public FreqManagerTest,
                             public ::testing::WithParamInterface<RejectRow> {};

TEST_P(FreqClientRejectTest, FailsAndRecordsNothing) {
    const RejectRow& row = GetParam();
    if (!row.executor) {
        mPlat.mExecutorPtr = nullptr;
    }
    mExec.setResult(Op::SetConfig, row.platformResult);
    EXPECT_EQ(client(1, row.pairs), row.expected);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, row.log), 1);
    EXPECT_EQ(setCalls().size(), row.reachesPlatform ? 1u : 0u);
    EXPECT_EQ(snapshot().kx, snapshot().jn) << "KX's table must stay as it started";
}

INSTANTIATE_TEST_SUITE_P(
    Rows, FreqClientRejectTest,
    ::testing::Values(
        // A negative value anywhere stops the request before the platform.
        RejectRow{
            "NegativeCap", true, 0, {{kL, 1}, {kB, -3}}, -1, "invalid config value(-3)", false},
        RejectRow{"NegativePassThrough", true, 0, {{3, -1}}, -1, "invalid config value(-1)", false},
        RejectRow{"NoExecutor", false, 0, {{kL, 1000000}}, -1, "doPerfSetConfig failed!", false},
        // The platform's own failure is handed back as is.
        RejectRow{"PlatformFails", true, 7, {{kL, 1000000}}, 7, "doPerfSetConfig failed!", true}),
    [](const ::testing::TestParamInfo<RejectRow>& info) { return info.param.name; });

TEST_F(FreqManagerTest, FeatureSwitchOnlyEverTurnsUploadOn) {
    const int tag = VELMORA_TAG_FEATURE_SWITCH;
    const int tags2[] = {tag, tag};
    const int words2[] = {FREQ_INFO_UPLOAD_BIT, FREQ_INFO_UPLOAD_BIT};
    const int other = 0x40000;
    const int kx = 1;
    EXPECT_EQ(mMgr.doPerfSetConfig(0, 1, &tag, &other, nullptr), 0);
    EXPECT_EQ(mMgr.doPerfSetConfig(0, 2, tags2, words2, nullptr), 0);
    EXPECT_EQ(mMgr.doPerfSetConfig(0, 1, &kx, &words2[0], nullptr), 0);
    EXPECT_FALSE(snapshot().uploadEnabled);
    const int word = FREQ_INFO_UPLOAD_BIT | 0x40000;
    EXPECT_EQ(mMgr.doPerfSetConfig(0, 1, &tag, &word, nullptr), 0);
    EXPECT_TRUE(snapshot().uploadEnabled);
    EXPECT_TRUE(mExec.calls().empty());
    EXPECT_TRUE(LogCapture::lines().empty());
}

TEST_F(FreqManagerTest, TopFrequenciesAreReadOnceAndReportsFollowMergedValues) {
    mExec.setConfigValue(VELMORA_TAG_LITTLE_CPU_TOP_FREQ, 1804800);
    mExec.setConfigValue(VELMORA_TAG_BIG_CPU_TOP_FREQ, 2419200);
    mExec.setConfigValue(VELMORA_TAG_GPU_TOP_FREQ, 2841600);
    enableUpload();
    ASSERT_EQ(client(2, {{kL, 1500000}}), 0);
    ASSERT_EQ(client(1, {{kL, 1800000}, {kB, 1209600}}), 0);  // sent as 1500000 and 1209600
    ASSERT_EQ(client(2, {{kL, 0}}), 0);                       // KX still limits
    ASSERT_EQ(client(1, {{kL, 0}, {kB, 0}}), 0);
    const auto reads = mExec.calls(Op::GetConfig);
    ASSERT_EQ(reads.size(), 1u);
    EXPECT_EQ(reads[0].tags, (Ints{22, 24, 26}));
    EXPECT_EQ(reportBodies(),
              (Strings{",1,1500,,,2>", ",3,1500,1209,,6>", ",3,1800,,,4>", ",2,-1,-1,,0>"}));
}

TEST_F(FreqManagerTest, FailedTopFrequencyReadIsRetriedWithoutReporting) {
    mExec.setConfigValue(VELMORA_TAG_LITTLE_CPU_TOP_FREQ, 1804800);
    enableUpload();
    mExec.setResult(Op::GetConfig, 9);
    EXPECT_EQ(client(1, {{kL, 1000000}}), 0);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "getConfig failed!"));
    EXPECT_TRUE(FakeEnv::get().jankLines().empty());
    EXPECT_FALSE(snapshot().maxFreqRead);
    mExec.setResult(Op::GetConfig, 0);
    EXPECT_EQ(client(1, {{kL, 1100000}}), 0);
    EXPECT_EQ(mExec.calls(Op::GetConfig).size(), 2u);
    // Big and GPU maxima stayed unknown (-1), so their unset values read as "not limited".
    EXPECT_EQ(reportBodies(), (Strings{",1,1100,-1,-1,4>"}));
}

}  // namespace
}  // namespace fake
}  // namespace velmora
