// Special scenes through velmoraEvent: which scene is withdrawn and which applied, in which
// order and with which payload, governor scenes under scene 4119, client restarts and scenes
// the configuration leaves without a priority.
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

TEST_F(ServerSceneTest, HigherSceneTakesOverAndHandsBack) {
    start();
    EXPECT_EQ(on(4118), 0);
    EXPECT_EQ(steps(), Steps({apply(4118)}));
    EXPECT_EQ(on(4119), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118), apply(4119)}));
    EXPECT_EQ(state().cur, 4119);
    // Switching the current scene on again changes nothing.
    EXPECT_EQ(on(4119), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().on, std::set<int32_t>({4118, 4119}));
    EXPECT_EQ(off(4119), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4119), apply(4118)}));
    EXPECT_EQ(state().cur, 4118);
    EXPECT_EQ(off(4118), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118)}));
    EXPECT_EQ(state().cur, 0);
    EXPECT_TRUE(state().on.empty());
}

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

TEST_F(ServerSceneTest, LowerScenesWaitInTheSetUntilTheHigherOneEnds) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    EXPECT_EQ(on(4120), 0);
    EXPECT_EQ(on(4121), 0);
    // A waiting scene switched off, and a scene that was never on, leave the platform alone.
    EXPECT_EQ(off(4120), 0);
    EXPECT_EQ(off(4119), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().on, std::set<int32_t>({4118, 4121}));
    EXPECT_EQ(state().cur, 4118);

    // The best waiting scene (4121, 70) comes next, then 4120 (20).
    EXPECT_EQ(on(4120), 0);
    EXPECT_EQ(off(4118), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118), apply(4121)}));
    EXPECT_EQ(off(4121), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4121), apply(4120)}));
}

TEST_F(ServerSceneTest, GovernorScenesUnderScene4119) {
    start();
    ASSERT_EQ(on(4119), 0);
    steps();
    // Applied on their own, 4119 stays current; a tie goes to the scene just switched on.
    EXPECT_EQ(on(4230), 0);
    EXPECT_EQ(steps(), Steps({apply(4230)}));
    EXPECT_EQ(on(4240), 0);
    EXPECT_EQ(steps(), Steps({apply(4240)}));
    // A lower governor scene re-applies the best one that is on; among the tied ones that is
    // the smaller cmdId, not the one applied last.
    EXPECT_EQ(on(4250), 0);
    EXPECT_EQ(steps(), Steps({apply(4230)}));
    EXPECT_EQ(state().cur, 4119);
    EXPECT_EQ(state().on, std::set<int32_t>({4119, 4230, 4240, 4250}));

    // Off: nothing is withdrawn; the best remaining governor scene is re-applied, a tie going
    // to the smaller cmdId.
    EXPECT_EQ(off(4240), 0);
    EXPECT_EQ(steps(), Steps({apply(4230)}));
    EXPECT_EQ(off(4230), 0);
    EXPECT_EQ(steps(), Steps({apply(4250)}));
    EXPECT_EQ(off(4250), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().cur, 4119);
}

TEST_F(ServerSceneTest, GovernorSceneAboveScene4119TakesOverLikeAnyScene) {
    start();
    ASSERT_EQ(on(4119), 0);
    ASSERT_EQ(on(4230), 0);
    steps();
    EXPECT_EQ(on(4260), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4119), apply(4260)}));
    EXPECT_EQ(state().cur, 4260);
    // Under another current scene a governor scene only waits.
    EXPECT_EQ(on(4240), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(off(4240), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(off(4260), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4260), apply(4119)}));
    EXPECT_EQ(state().cur, 4119);
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

TEST_F(ServerSceneTest, UnconfiguredPriorityIsRefusedWithoutTouchingTheState) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    EXPECT_EQ(on(4130), -1);
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "invalid special scene priority, cmdId is 4130"));
    EXPECT_EQ(off(4130), -1);
    EXPECT_EQ(steps(), Steps());
    const SceneState s = state();
    EXPECT_EQ(s.cur, 4118);
    EXPECT_EQ(s.on, std::set<int32_t>({4118}));
    // The lookup remembered the scene as invalid.
    ASSERT_EQ(s.prio.count(4130), 1u);
    EXPECT_EQ(s.prio.at(4130), 0);
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

}  // namespace
}  // namespace fake
}  // namespace velmora
