// Scheduler-group levels through the server: start-up defaults, duration-0 events, client
// requests with tags 40/42 and the "--easgrouplist" dump read back from a descriptor.
#include <unistd.h>

#include <map>
#include <string>
#include <vector>

#include "tests/sched/SchedTestHelpers.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

const char* const kProbeCommand =
    "<cmd id=\"4116\" name=\"probe\"><act><duration>8</duration><t1>1000</t1></act></cmd>";

// Duration-0 commands of the tests: the reference/follower pair 4114/4113, an ordinary event
// and one with a frequency tag among its groups.
const char* const kSchedCommands =
    "<cmd id=\"4114\" name=\"zola_reference\"><act><duration>0</duration>"
    "<t53>20</t53><t54>10</t54></act></cmd>"
    "<cmd id=\"4113\" name=\"zola_follower\"><act><duration>0</duration>"
    "<t53>0</t53><t54>0</t54><t55>10</t55></act></cmd>"
    "<cmd id=\"4500\" name=\"top_app_up\"><act><duration>0</duration><t53>30</t53></act></cmd>"
    "<cmd id=\"4501\" name=\"bad_tag\"><act><duration>0</duration><t53>30</t53><t42>1</t42>"
    "</act></cmd>";

std::string startupWith(const std::string& defaultPairs) {
    return "<cmd id=\"5376\" name=\"default_sched\"><act><duration>0</duration>" + defaultPairs +
           "</act></cmd>" + kProbeCommand;
}

// Start-up pairs of the eight EAS groups at `levels` (0 when missing); `fourth` renames the
// fourth one's tag.
std::string easXml(std::map<int, int> levels = {}, const std::string& fourth = "") {
    std::string xml;
    for (int tag = 51; tag <= 58; ++tag) {
        const std::string name = tag == 54 && !fourth.empty() ? fourth : "t" + std::to_string(tag);
        xml += "<" + name + ">" + std::to_string(levels[tag]) + "</" + name + ">";
    }
    return xml;
}

class ServerSchedTest : public ServerSceneTest {
protected:
    std::vector<ExecutorCall> sent() { return executor().calls(Op::SchedLevel); }
};

TEST_F(ServerSchedTest, EasDefaultsAreInstalledAtStartUpWithoutPlatformCall) {
    // Distinct levels for tags 56 and 57: the dump lists key-background before
    // system-background, against the tag order.
    writeCustConfig(policyXml(startupWith(easXml({{56, 6}, {57, 7}}))));
    mServer = std::make_unique<VelmoraServer>();
    ASSERT_EQ(mServer->init(), 0);
    EXPECT_TRUE(sent().empty());
    const auto defaults = easLevels(0, {{56, 6}, {57, 7}});
    EXPECT_EQ(dump("--easgrouplist"),
              easDump(defaults, defaults, defaults, defaults, defaults) + "\n");
}

TEST_F(ServerSchedTest, HmpDefaultDrivesTheSingleGroup) {
    writeCustConfig(policyXml(startupWith("<t50>10</t50>") +
                              "<cmd id=\"4500\"><act><duration>0</duration><t50>30</t50>"
                              "<t53>0</t53></act></cmd>"));
    mServer = std::make_unique<VelmoraServer>();
    ASSERT_EQ(mServer->init(), 0);
    EXPECT_TRUE(sent().empty());

    EXPECT_EQ(mServer->velmoraEvent(4500, "", 0, nullptr), 0);
    ASSERT_EQ(sent().size(), 1u);
    EXPECT_EQ(sent()[0].tags, std::vector<int>({50}));
    EXPECT_EQ(sent()[0].values, std::vector<int>({30}));

    EXPECT_EQ(setConfig(2, {42}, {packLevel(0, -20)}), 0);
    ASSERT_EQ(sent().size(), 2u);
    EXPECT_EQ(sent()[1].tags, std::vector<int>({50}));
    EXPECT_EQ(sent()[1].values, std::vector<int>({-20}));

    EXPECT_EQ(dump("--easgrouplist"),
              "default eas group value is:\n"
              "group=hmp,               value=10\n"
              "current eas group value is:\n"
              "group=hmp,               value=-20\n"
              "KX set eas group value is:\n"
              "group=hmp,               value=10\n"
              "JN set eas group value is:\n"
              "group=hmp,               value=-20\n"
              "ZOLA set eas group value is:\n"
              "group=hmp,               value=30\n"
              "\n");
}

struct BadDefaultsRow {
    const char* name;
    std::string pairs;
    int prio;
    std::string log;
};

class ServerSchedBadDefaultsTest : public ServerSchedTest,
                                   public ::testing::WithParamInterface<BadDefaultsRow> {};

TEST_P(ServerSchedBadDefaultsTest, InitFailsAndReleasesEverything) {
    writeCustConfig(policyXml(startupWith(GetParam().pairs)));
    mServer = std::make_unique<VelmoraServer>();
    EXPECT_EQ(mServer->init(), 3);
    EXPECT_TRUE(LogCapture::has(GetParam().prio, GetParam().log)) << GetParam().log;
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=5376"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "init default group sched level failed!"));
    EXPECT_FALSE(mServer->mInitialized);
    EXPECT_EQ(mServer->mSchedLevelPtr, nullptr);
    EXPECT_TRUE(sent().empty());
    EXPECT_EQ(mServer->velmoraEvent(4500, "", 0, nullptr), 1);
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, ServerSchedBadDefaultsTest,
    ::testing::Values(
        BadDefaultsRow{"ThreePairs", "<t51>0</t51><t52>0</t52><t53>0</t53>", ANDROID_LOG_ERROR,
                       "init default group failed! tagLen must be (eas:8, hmp:1)"},
        BadDefaultsRow{"HmpAmongEasPairs", easXml({}, "t50"), ANDROID_LOG_ERROR,
                       "invalid eas group, group tag is 0"}),
    [](const ::testing::TestParamInfo<BadDefaultsRow>& info) { return info.param.name; });
// clang-format on

TEST_F(ServerSchedTest, EventReachesThePlatformOnlyWhenItChangesALevel) {
    ASSERT_EQ(startServer(kSchedCommands), 0);
    EXPECT_EQ(mServer->velmoraEvent(4500, "", 0, nullptr), 0);
    ASSERT_EQ(sent().size(), 1u);
    EXPECT_EQ(sent()[0].tags, std::vector<int>({51, 52, 53, 54, 55, 56, 57, 58}));
    EXPECT_EQ(sent()[0].values, std::vector<int>({-100, -100, 30, -100, -100, -100, -100, -100}));

    EXPECT_EQ(mServer->velmoraEvent(4500, "", 0, nullptr), 0);
    EXPECT_EQ(sent().size(), 1u);
    const auto zola = easLevels(-100, {{53, 30}});
    EXPECT_EQ(dump("--easgrouplist"),
              easDump(easLevels(0), zola, easLevels(0), easLevels(0), zola) + "\n");
}

TEST_F(ServerSchedTest, FollowerMovesOnlyGroupsStillAtTheReference) {
    ASSERT_EQ(startServer(kSchedCommands), 0);
    ASSERT_EQ(mServer->velmoraEvent(4114, "", 0, nullptr), 0);  // 53 -> 20, 54 -> 10
    ASSERT_EQ(mServer->velmoraEvent(4500, "", 0, nullptr), 0);  // 53 -> 30 meanwhile
    executor().clear();

    EXPECT_EQ(mServer->velmoraEvent(4113, "", 0, nullptr), 0);
    ASSERT_EQ(sent().size(), 1u);
    // 53 moved away from the reference and stays; 54 still at it and 55 unset in both move.
    EXPECT_EQ(sent()[0].values, std::vector<int>({-100, -100, 30, 0, 10, -100, -100, -100}));
}

TEST_F(ServerSchedTest, RejectedOrFailedActionLeavesTheTables) {
    ASSERT_EQ(startServer(kSchedCommands), 0);
    EXPECT_EQ(mServer->velmoraEvent(4501, "", 0, nullptr), 3);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_DEBUG,
                                "cmdId(4501) (duration=0) does not support other tags except sched "
                                "level!"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4501"));

    // A refused event is an action failure too; a refused client request hands the platform's
    // own result back. Neither leaves a trace in the tables.
    const std::string before = dump("--easgrouplist");
    executor().setResult(Op::SchedLevel, 9);
    EXPECT_EQ(mServer->velmoraEvent(4500, "", 0, nullptr), 3);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4500"));
    EXPECT_EQ(setConfig(2, {42}, {packLevel(3, -10)}), 9);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, "doSchedLevelAction failed!"), 4);
    EXPECT_EQ(dump("--easgrouplist"), before);
}

TEST_F(ServerSchedTest, ClientRequestsMergeAcrossClients) {
    ASSERT_EQ(startServer(kSchedCommands), 0);
    EXPECT_EQ(setConfig(1, {42, 42}, {packLevel(3, -10), packLevel(5, 20)}), 0);
    EXPECT_EQ(setConfig(2, {42}, {packLevel(3, -20)}), 0);
    EXPECT_EQ(setConfig(3, {42}, {packLevel(5, 30)}), 0);
    ASSERT_EQ(sent().size(), 3u);
    // Top-app: the lowest client wins. Foreground: KX above the default has no say, ZOLA does.
    EXPECT_EQ(sent()[2].values, std::vector<int>({0, 0, -20, 0, 30, 0, 0, 0}));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO,
                                "setConfig clientId=1, tagLen=2, tags[1]=42, configs[1]=" +
                                    std::to_string(packLevel(5, 20))));

    EXPECT_EQ(dump("--easgrouplist"), easDump(easLevels(0), easLevels(0, {{53, -20}, {55, 30}}),
                                              easLevels(0, {{53, -10}, {55, 20}}),
                                              easLevels(0, {{53, -20}}), easLevels(0, {{55, 30}})) +
                                          "\n");
}

TEST_F(ServerSchedTest, StepAndResetOfAClient) {
    ASSERT_EQ(startServer(kSchedCommands), 0);
    ASSERT_EQ(setConfig(1, {42}, {packLevel(3, 10)}), 0);
    // Down: top-app 10 -> 0 (no longer below the default), the others 0 -> -10.
    EXPECT_EQ(setConfig(1, {40}, {1}), 0);
    EXPECT_EQ(sent().back().values, std::vector<int>({-10, -10, 0, -10, -10, -10, -10, -10}));
    EXPECT_EQ(setConfig(1, {40}, {1}), 0);
    EXPECT_EQ(sent().back().values, std::vector<int>({-20, -20, -10, -20, -20, -20, -20, -20}));
    EXPECT_EQ(setConfig(1, {40}, {2}), 0);
    EXPECT_EQ(sent().back().values, std::vector<int>({-10, -10, 0, -10, -10, -10, -10, -10}));
    EXPECT_EQ(setConfig(1, {40}, {0}), 0);
    EXPECT_EQ(sent().back().values, std::vector<int>(8, 0));
    EXPECT_EQ(sent().size(), 5u);
}

TEST_F(ServerSchedTest, RejectedRequestIsPassedOnWithItsOwnLog) {
    ASSERT_EQ(startServer(kSchedCommands), 0);
    // A frequency tag next to tag 42 sends the whole request to the scheduling manager.
    EXPECT_EQ(setConfig(1, {22, 42}, {1000, packLevel(3, -10)}), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR,
                                "velmoraSetConfig doPerfSetSchedLevel failed! clientId=1"));
    EXPECT_TRUE(sent().empty());
    EXPECT_TRUE(executor().calls(Op::SetConfig).empty());
}

}  // namespace
}  // namespace fake
}  // namespace velmora
