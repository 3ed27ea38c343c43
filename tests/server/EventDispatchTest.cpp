// velmoraEvent: the door checks, which command ids go where, launch policies, notifications
// and on/off actions, observed at the platform and in the log.
#include <string>

#include "platform/VelmoraPlat.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

const char* const kDispatchCommands =
    "<cmd id=\"4353\" name=\"after_scenes\"><a><duration>30</duration><t1>800</t1></a></cmd>"
    "<cmd id=\"12287\" name=\"before_onoff\"><a><duration>40</duration><t1>700</t1></a></cmd>"
    "<cmd id=\"13569\" name=\"after_onoff\"><a><duration>45</duration><t1>600</t1></a></cmd>"
    "<cmd id=\"12288\" name=\"onoff_platform\"><a><duration>0</duration><t10>5</t10></a></cmd>"
    "<cmd id=\"13568\" name=\"onoff_mixed\"><a><duration>0</duration><t10>5</t10><t22>0</t22>"
    "</a></cmd>"
    "<cmd id=\"12300\" name=\"onoff_timed\"><a><duration>20</duration><t2>900</t2></a></cmd>"
    "<cmd id=\"12301\" name=\"onoff_empty\"><a><duration>0</duration></a></cmd>"
    "<cmd id=\"12302\" name=\"onoff_both\"><a><duration>0</duration><t10>5</t10>"
    "<t2>900000</t2></a></cmd>"
    "<cmd id=\"4099\" name=\"cold\"><a><duration>500</duration><t4>2000</t4></a></cmd>"
    "<cmd id=\"4098\" name=\"winswitch\"><a><duration>300</duration><t4>1800</t4></a></cmd>"
    "<cmd id=\"4401\" name=\"disabled\"><a><duration>-1</duration><t1>1</t1></a></cmd>"
    "<cmd id=\"4402\" name=\"head_only\"></cmd>"
    "<cmd id=\"-7\" name=\"negative\"><a><duration>10</duration></a></cmd>";

class EventDispatchTest : public ServerSceneTest {
protected:
    void SetUp() override {
        ServerSceneTest::SetUp();
        start(kDispatchCommands);
    }
};

TEST_F(EventDispatchTest, TimedActionReachesThePlatformWithTheHostPayload) {
    const int payload[2] = {0, 99};
    EXPECT_EQ(mServer->velmoraEvent(4353, "", 2, payload), 0);
    const std::vector<ExecutorCall> calls = actions();
    ASSERT_EQ(calls.size(), 1u);
    const ExecutorCall& call = calls[0];
    EXPECT_EQ(call.id, 4353);
    EXPECT_EQ(call.name, "after_scenes");
    EXPECT_EQ(call.duration, 30);
    EXPECT_EQ(call.tagValues, (std::vector<int>{1, 800}));
    EXPECT_EQ(call.payload, (std::vector<int>{0, 99}));
}

TEST_F(EventDispatchTest, ClassBoundaries) {
    // 4352 is the last special scene: it has no priority, so it is refused as a scene.
    EXPECT_EQ(mServer->velmoraEvent(4352, "", 1, &kOn), 2);  // and it is not configured
    EXPECT_EQ(mServer->velmoraEvent(4353, "", 1, &kOn), 0);
    EXPECT_EQ(mServer->velmoraEvent(12287, "", 1, &kOn), 0);
    EXPECT_EQ(mServer->velmoraEvent(13569, "", 1, &kOn), 0);
    ASSERT_EQ(actions().size(), 3u);
    EXPECT_EQ(actions()[1].payload, std::vector<int>{0});

    // 12288 and 13568 are on/off actions: a bad payload is refused before the platform.
    const int bad = 3;
    EXPECT_EQ(mServer->velmoraEvent(12288, "", 1, &bad), -1);
    EXPECT_EQ(mServer->velmoraEvent(13568, "", 1, &bad), -1);
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "invalid special scene parameters, cmdId is 12288"));
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "invalid special scene parameters, cmdId is 13568"));
    EXPECT_EQ(actions().size(), 3u);
}

// From 20224 up ids are not parsed; 4401 is disabled, 4402 has no action, 12301 no pairs.
TEST_F(EventDispatchTest, UnparsedDisabledAndEmptyCommandsDoNothing) {
    for (int cmdId : {20300, 20226, 4401, 4402, 12301}) {
        EXPECT_EQ(mServer->velmoraEvent(cmdId, "", 1, &kOn), 0) << cmdId;
    }
    EXPECT_EQ(LogCapture::countContaining("doParse"), 0);
    EXPECT_TRUE(executor().calls().empty());
}

TEST_F(EventDispatchTest, NegativeIdsAreParsedLikeAnyCommand) {
    EXPECT_EQ(mServer->velmoraEvent(-7, "", 1, &kOn), 0);
    EXPECT_EQ(actions().size(), 1u);
}

TEST_F(EventDispatchTest, PlatformFailureOrMissingExecutorIsStatusThree) {
    executor().setResult(Op::DoAction, 9);
    EXPECT_EQ(mServer->velmoraEvent(4353, "", 1, &kOn), 3);
    mServer->mPlatPtr->mExecutorPtr = nullptr;
    EXPECT_EQ(mServer->velmoraEvent(4353, "", 1, &kOn), 3);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4353"), 2);
    EXPECT_EQ(mServer->velmoraEvent(12288, "", 1, &kOn), -1);
}

TEST_F(EventDispatchTest, DebugLogTracesEntryPoints) {
    EXPECT_EQ(mServer->velmoraEvent(4353, "", 1, &kOn), 0);
    EXPECT_EQ(LogCapture::countContaining("velmoraEvent cmdId="), 0);
    dump("--logon");
    EXPECT_EQ(mServer->velmoraEvent(4353, "", 1, &kOn), 0);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO, "velmoraEvent cmdId=4353, payload=0"));
    EXPECT_EQ(mServer->velmoraEvent(20300, "", 0, nullptr), 0);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO, "velmoraEvent cmdId=20300"));
    dump("--logoff");
    EXPECT_FALSE(mServer->mDebugLog);
}

// Launch policies replace the duration of cold starts and window switches once the
// notification word enables them.
enum class Notify { None, Enable, EnableThenClear };
constexpr int kNoPolicy = 0;  // the policy server knows no answer

struct PolicyRow {
    const char* name;
    Notify notify;
    int cmdId;
    const char* policyName;
    int policy;
    int payload;
    int duration;  // what the platform gets; -1: nothing reaches it
    bool consulted;
};

class LaunchPolicyTest : public EventDispatchTest,
                         public ::testing::WithParamInterface<PolicyRow> {};

TEST_P(LaunchPolicyTest, DecidesTheDuration) {
    const PolicyRow& row = GetParam();
    const int enable = 0x40000;
    const int clear = 0;
    if (row.notify != Notify::None) {
        mServer->velmoraEvent(kNotification, "", 1, &enable);
    }
    if (row.notify == Notify::EnableThenClear) {
        mServer->velmoraEvent(kNotification, "", 1, &clear);  // bit 18 cleared again
    }
    if (row.policy != kNoPolicy) {
        env().setPolicy(row.policyName, row.policy);
    }
    executor().clear();
    EXPECT_EQ(mServer->velmoraEvent(row.cmdId, "", 1, &row.payload), 0);
    if (row.duration < 0) {
        EXPECT_TRUE(actions().empty());
    } else {
        ASSERT_EQ(actions().size(), 1u);
        EXPECT_EQ(actions()[0].duration, row.duration);
    }
    EXPECT_EQ(env().policyQueries() > 0, row.consulted);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, LaunchPolicyTest,
    ::testing::Values(
        PolicyRow{"ColdStartTakesThePolicy", Notify::Enable, 4099, "cold", 80, kOn, 80, true},
        PolicyRow{"WindowSwitchTakesThePolicy", Notify::Enable, 4098, "winswitch", 40, kOn, 40,
                  true},
        PolicyRow{"NoAnswerKeepsTheConfiguredDuration", Notify::Enable, 4099, "cold", kNoPolicy,
                  kOn, 500, true},
        PolicyRow{"NegativeAnswerDisablesTheEvent", Notify::Enable, 4099, "cold", -5, kOn, -1,
                  true},
        // Only an on payload consults the policy server.
        PolicyRow{"OffPayloadIsNotConsulted", Notify::Enable, 4099, "cold", 80, kOff, 500, false},
        PolicyRow{"OffUntilTheNotificationEnablesThem", Notify::None, 4099, "cold", 80, kOn, 500,
                  false},
        PolicyRow{"OffAgainOnceTheBitIsCleared", Notify::EnableThenClear, 4099, "cold", 80, kOn,
                  500, false}),
    [](const ::testing::TestParamInfo<PolicyRow>& info) { return info.param.name; });

TEST_F(EventDispatchTest, NotificationWithWrongPayloadChangesNothing) {
    const int words[2] = {0x40000, 0};
    EXPECT_EQ(mServer->velmoraEvent(kNotification, "", 2, words), 0);
    EXPECT_EQ(mServer->velmoraEvent(kNotification, "", 1, nullptr), 0);
    EXPECT_FALSE(mServer->mPolicyEnabled);
    EXPECT_EQ(mServer->velmoraEvent(kNotification, "", 1, words), 0);
    EXPECT_TRUE(mServer->mPolicyEnabled);
}

// On/off commands: pairs with tag 10 belong to the platform, the others to the frequency
// manager.
// Only platform pairs, or a positive duration (a timed platform action): the executor alone.
TEST_F(EventDispatchTest, OnOffWithOnlyPlatformPairsGoesToTheExecutorAlone) {
    EXPECT_EQ(on(12288), 0);
    EXPECT_EQ(off(12288), 0);
    EXPECT_EQ(on(12300), 0);
    ASSERT_EQ(actions().size(), 3u);
    EXPECT_EQ(actions()[0].payload, std::vector<int>{0});
    EXPECT_EQ(actions()[1].payload, std::vector<int>{-1});
    EXPECT_EQ(actions()[2].duration, 20);
    EXPECT_TRUE(executor().calls(Op::SetConfig).empty());
}

TEST_F(EventDispatchTest, OnOffPairBelowOneIsRefused) {
    EXPECT_EQ(mServer->velmoraEvent(13568, "", 1, &kOn), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "invalid parameters, cmdId is 13568"));
    EXPECT_TRUE(executor().calls().empty());
}

// A platform may install another executor at any time; an on/off command that goes to the
// frequency manager first must hand its platform part to the executor installed by then.
class SwappingExecutor : public FakeExecutor {
public:
    int doPerfSetConfig(int id, int count, const int* tags, const int* values) override {
        FakeEnv::get().lastPlat->mExecutorPtr = replacement;
        return FakeExecutor::doPerfSetConfig(id, count, tags, values);
    }
    PerfExecutor* replacement = nullptr;
};

TEST_F(EventDispatchTest, OnOffUsesTheExecutorInstalledDuringTheFrequencyCall) {
    SwappingExecutor first;
    first.replacement = &executor();
    env().lastPlat->mExecutorPtr = &first;
    EXPECT_EQ(mServer->velmoraEvent(12302, "", 1, &kOn), 0);
    EXPECT_EQ(first.calls(Op::SetConfig).size(), 1u);
    EXPECT_TRUE(first.calls(Op::DoAction).empty());
    ASSERT_EQ(actions().size(), 1u);
    EXPECT_EQ(actions()[0].id, 12302);
}

TEST_F(ServerSceneTest, OnOffWithMoreFrequencyPairsThanTheManagerTakesIsRefused) {
    std::string pairs;
    for (int i = 0; i < 44; ++i) {
        pairs += "<t2>" + std::to_string(1000000 + i) + "</t2>";
    }
    start("<cmd id=\"12400\"><a><duration>0</duration>" + pairs + "</a></cmd>");
    EXPECT_EQ(mServer->velmoraEvent(12400, "", 1, &kOn), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR,
                                "on/off command 12400 has more than 43 frequency pairs, rejected"));
    EXPECT_TRUE(executor().calls().empty());
}

}  // namespace
}  // namespace fake
}  // namespace velmora
