// Special scenes through velmoraEvent: which scene is withdrawn and which applied, in which
// order and with which payload, governor scenes under scene 4119, client restarts, scenes the
// configuration leaves without a priority, and what goes wrong: invalid payloads, platform
// failures, a missing executor and a scene dropped by a reload.
#include <utility>

#include "config/Action.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

// One host event and the doAction calls it must cause, in order.
struct Move {
    int cmdId;
    int word;
    Steps expected;
};
Move onMove(int cmdId, Steps expected = {}) {
    return {cmdId, kOn, std::move(expected)};
}
Move offMove(int cmdId, Steps expected = {}) {
    return {cmdId, kOff, std::move(expected)};
}

// A sequence of scene switches, and the current scene and the set of scenes on at the end.
struct SceneScript {
    const char* name;
    int cur;
    std::set<int32_t> on;
    std::string commands;
    std::vector<Move> moves;
};

class ServerSceneScriptTest : public ServerSceneTest,
                              public ::testing::WithParamInterface<SceneScript> {};

TEST_P(ServerSceneScriptTest, PlatformSeesEachSwitch) {
    const SceneScript& script = GetParam();
    start(script.commands);
    for (size_t i = 0; i < script.moves.size(); ++i) {
        const Move& move = script.moves[i];
        EXPECT_EQ(mServer->velmoraEvent(move.cmdId, "", 1, &move.word), 0) << "move " << i;
        EXPECT_EQ(steps(), move.expected) << "move " << i;
    }
    EXPECT_EQ(state().cur, script.cur);
    EXPECT_EQ(state().on, script.on);
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Scripts, ServerSceneScriptTest,
    ::testing::Values(
        // Switching the current scene on again changes nothing.
        SceneScript{"HigherSceneTakesOverAndHandsBack", 0, {}, kSceneCommands,
                    {onMove(4118, {apply(4118)}), onMove(4119, {withdraw(4118), apply(4119)}),
                     onMove(4119), offMove(4119, {withdraw(4119), apply(4118)}),
                     offMove(4118, {withdraw(4118)})}},
        // A waiting scene switched off, and one never on, leave the platform alone; the best
        // waiting scene (4121, 70) comes next, then 4120 (20).
        SceneScript{"LowerScenesWaitUntilTheHigherOneEnds", 4120, {4120}, kSceneCommands,
                    {onMove(4118, {apply(4118)}), onMove(4120), offMove(4120), offMove(4119),
                     offMove(4118, {withdraw(4118)}), onMove(4118, {apply(4118)}), onMove(4120),
                     onMove(4121), offMove(4118, {withdraw(4118), apply(4121)}),
                     offMove(4121, {withdraw(4121), apply(4120)})}},
        // Under 4119 governor scenes are applied on their own and 4119 stays current. A tie
        // goes to the scene just switched on; a lower one re-applies the best one that is on,
        // among tied ones the smaller cmdId. Off withdraws nothing and re-applies the best
        // remaining one.
        SceneScript{"GovernorScenesUnderScene4119", 4119, {4119}, kSceneCommands,
                    {onMove(4119, {apply(4119)}), onMove(4230, {apply(4230)}),
                     onMove(4240, {apply(4240)}), onMove(4250, {apply(4230)}),
                     offMove(4240, {apply(4230)}), offMove(4230, {apply(4250)}), offMove(4250)}},
        // Above 4119 a governor scene takes over like any scene; under it one only waits.
        SceneScript{"GovernorSceneAboveScene4119", 4119, {4119, 4230}, kSceneCommands,
                    {onMove(4119, {apply(4119)}), onMove(4230, {apply(4230)}),
                     onMove(4260, {withdraw(4119), apply(4260)}), onMove(4240), offMove(4240),
                     offMove(4260, {withdraw(4260), apply(4119)})}},
        // Equal priorities go to the smaller cmdId, and never take over the current scene.
        SceneScript{"EqualPrioritiesGoToTheSmallerCmdId", 4121, {4118, 4121},
                    scene(4118) + scene(4119) + scene(4121, "<t101>100</t101>"),
                    {onMove(4119, {apply(4119)}), onMove(4121), onMove(4118),
                     offMove(4119, {withdraw(4119), apply(4118)}),
                     offMove(4118, {withdraw(4118), apply(4121)}), onMove(4118)}}),
    [](const ::testing::TestParamInfo<SceneScript>& info) { return info.param.name; });
// clang-format on

TEST_F(ServerSceneTest, PlatformGetsTheConfiguredActionWithOnePayloadInt) {
    // The duration only gates dispatch: a timed scene still goes through the scene path with
    // the on/off word, not as a timed action with the host's payload.
    start(scene(4118, "<t1>1500</t1><t2>800</t2>", 3000));
    EXPECT_EQ(on(4118), 0);
    const auto calls = executor().calls(Op::DoAction);
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].id, 4118);
    EXPECT_EQ(calls[0].name, "scene_4118");
    EXPECT_EQ(calls[0].tagValues, std::vector<int>({1, 1500, 2, 800}));
    EXPECT_EQ(calls[0].payload, std::vector<int>({kOn}));
}

TEST_F(ServerSceneTest, ClientRestartWithdrawsTheCurrentSceneAndForgetsTheRest) {
    start();
    // Without a current scene a restart has nothing to withdraw.
    EXPECT_EQ(restart(), 0);
    EXPECT_EQ(LogCapture::countContaining("client may rebooted"), 0);
    ASSERT_EQ(on(4118), 0);
    ASSERT_EQ(on(4120), 0);
    steps();
    const auto prioBefore = state().prio;

    // The withdrawal's result is passed through.
    executor().setResult(Op::DoAction, 9);
    EXPECT_EQ(restart(), 9);
    executor().setResult(Op::DoAction, 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118)}));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO,
                                "client may rebooted, clean special scene set, cmdId is 20224"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4118"));
    EXPECT_EQ(state().cur, 0);
    EXPECT_TRUE(state().on.empty());
    EXPECT_EQ(state().prio, prioBefore);

    // 4120 was dropped with the set: switching it off is a no-op, and the next scene is
    // applied alone.
    EXPECT_EQ(off(4120), 0);
    EXPECT_EQ(on(4121), 0);
    EXPECT_EQ(steps(), Steps({apply(4121)}));
}

// A scene configured without a priority, and payloads other than exactly one int 0 or -1
// (checked before the scene state is looked at), are refused and change nothing.
TEST_F(ServerSceneTest, RefusedSwitchesLeaveTheStateAlone) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    EXPECT_EQ(on(4130), -1);
    EXPECT_EQ(off(4130), -1);
    const int minusTwo = -2;
    const int twoOn[2] = {kOn, kOn};
    EXPECT_EQ(mServer->velmoraEvent(4119, "", 1, &minusTwo), -1);
    EXPECT_EQ(mServer->velmoraEvent(4119, "", 2, twoOn), -1);
    EXPECT_EQ(mServer->velmoraEvent(4119, "", 0, nullptr), -1);
    EXPECT_EQ(
        LogCapture::count(ANDROID_LOG_ERROR, "invalid special scene parameters, cmdId is 4119"), 3);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().cur, 4118);
    EXPECT_EQ(state().on, std::set<int32_t>({4118}));
}

TEST_F(ServerSceneTest, UnparsableOrDisabledSceneIsNotDispatched) {
    start(scene(4118, "", -1));
    EXPECT_EQ(on(4131), 2);
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doParse failed! cmdId=4131, errno=1"));
    EXPECT_EQ(on(4118), 0);  // duration -1
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().on, std::set<int32_t>());
    EXPECT_EQ(state().cur, 0);
}

TEST_F(ServerSceneTest, TwoResultsAreJoinedByBitwiseOr) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    // Withdrawing 4118 answers 1, applying 4119 answers 4.
    executor().setActionHook(
        [this](const Action* a) { executor().setResult(Op::DoAction, a->mCmdId == 4118 ? 1 : 4); });
    EXPECT_EQ(on(4119), 5);
    EXPECT_EQ(steps(), Steps({withdraw(4118), apply(4119)}));

    // Handing back joins the same way: withdraw 4119 (4) | apply 4118 (1).
    EXPECT_EQ(off(4119), 5);
    EXPECT_EQ(steps(), Steps({withdraw(4119), apply(4118)}));
    executor().setActionHook(nullptr);
}

TEST_F(ServerSceneTest, StateIsNotRolledBackWhenThePlatformFails) {
    start();
    executor().setResult(Op::DoAction, 6);
    EXPECT_EQ(on(4118), 6);
    EXPECT_EQ(on(4119), 6);
    EXPECT_EQ(state().cur, 4119);
    EXPECT_EQ(state().on, std::set<int32_t>({4118, 4119}));
    executor().setResult(Op::DoAction, 0);
    steps();
    EXPECT_EQ(off(4119), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4119), apply(4118)}));

    // Without an executor the action fails, and the state still moves on.
    env().lastPlat->mExecutorPtr = nullptr;
    EXPECT_EQ(on(4119), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4119"));
    EXPECT_EQ(state().cur, 4119);
}

TEST_F(ServerSceneTest, SceneDroppedByAReloadCannotBeWithdrawn) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    ASSERT_EQ(reload(scene(4119)), 0);
    // Withdrawing 4118 fails to parse (2); applying 4119 succeeds (0).
    EXPECT_EQ(on(4119), 2);
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doParse failed! cmdId=4118, errno=1"));
    EXPECT_EQ(steps(), Steps({apply(4119)}));
    EXPECT_EQ(state().cur, 4119);
}

TEST_F(ServerSceneTest, DebugLogTracesEverySceneAction) {
    start();
    dump("--logon");
    ASSERT_EQ(on(4118), 0);
    ASSERT_EQ(on(4119), 0);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO, "doSpecialAction cmdId is 4118, payload is -1"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO, "doSpecialAction cmdId is 4119, payload is 0"));
    dump("--logoff");
    LogCapture::clear();
    ASSERT_EQ(off(4119), 0);
    EXPECT_EQ(LogCapture::countContaining("doSpecialAction"), 0);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
