// Special scenes when something goes wrong: invalid payloads, platform failures and a missing
// executor, and a scene dropped by a reload.
#include "config/Action.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

// Invalid payloads are refused before the scene state is looked at.
struct PayloadRow {
    const char* what;
    unsigned int payloadNum;
    std::vector<int> payload;  // empty: null pointer
};

class ServerSceneInvalidPayloadTest : public ServerSceneTest,
                                      public ::testing::WithParamInterface<PayloadRow> {};

TEST_P(ServerSceneInvalidPayloadTest, IsRefusedAndChangesNothing) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    LogCapture::clear();
    const PayloadRow& row = GetParam();
    const int* payload = row.payload.empty() ? nullptr : row.payload.data();
    EXPECT_EQ(mServer->velmoraEvent(4119, "", row.payloadNum, payload), -1);
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "invalid special scene parameters, cmdId is 4119"));
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().cur, 4118);
    EXPECT_EQ(state().on, std::set<int32_t>({4118}));
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ServerSceneInvalidPayloadTest,
    ::testing::Values(PayloadRow{"payload_one", 1, {1}},  // neither on nor off
                      PayloadRow{"payload_minus_two", 1, {-2}}, PayloadRow{"null_payload", 1, {}},
                      PayloadRow{"no_payload", 0, {}},
                      PayloadRow{"two_ints", 2, {0, 0}}),  // only exactly one int counts
    [](const ::testing::TestParamInfo<PayloadRow>& info) { return std::string(info.param.what); });

TEST_F(ServerSceneTest, TwoResultsAreJoinedByBitwiseOr) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    // Withdrawing 4118 answers 1, applying 4119 answers 4.
    executor().setActionHook(
        [this](const Action* a) { executor().setResult(Op::DoAction, a->mCmdId == 4118 ? 1 : 4); });
    EXPECT_EQ(on(4119), 5);
    EXPECT_EQ(steps(), Steps({withdraw(4118), apply(4119)}));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4118"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4119"));

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
