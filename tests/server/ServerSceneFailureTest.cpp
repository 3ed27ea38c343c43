// Special scenes when something goes wrong: invalid payloads, platform failures and a missing
// executor, a scene dropped by a reload, and host threads switching scenes concurrently while the
// configuration is reloaded.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <random>
#include <thread>

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
    writeCustConfig(policyXml(std::string(kStartupCommands) + scene(4119)));
    ASSERT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), 0);
    // Withdrawing 4118 fails to parse (2); applying 4119 succeeds (0).
    EXPECT_EQ(on(4119), 2);
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doParse failed! cmdId=4118, errno=1"));
    EXPECT_EQ(steps(), Steps({apply(4119)}));
    EXPECT_EQ(state().cur, 4119);
}

TEST_F(ServerSceneTest, DebugLogTracesEverySceneAction) {
    start();
    const int fd = open("/dev/null", O_WRONLY);
    ASSERT_GE(fd, 0);
    mServer->dumpVelmoraServerInfo(fd, {"--logon"});
    ASSERT_EQ(on(4118), 0);
    ASSERT_EQ(on(4119), 0);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO, "doSpecialAction cmdId is 4118, payload is -1"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO, "doSpecialAction cmdId is 4119, payload is 0"));
    mServer->dumpVelmoraServerInfo(fd, {"--logoff"});
    close(fd);
    LogCapture::clear();
    ASSERT_EQ(off(4119), 0);
    EXPECT_EQ(LogCapture::countContaining("doSpecialAction"), 0);
}

// Host threads switch scenes concurrently; whatever the interleaving, the current scene must
// be a switched-on scene of the highest priority, and none when nothing is on. Checked under
// mMutex while the switches run and once they are done.
::testing::AssertionResult currentIsBest(const SceneState& s) {
    if (s.on.empty()) {
        if (s.cur == 0) {
            return ::testing::AssertionSuccess();
        }
        return ::testing::AssertionFailure() << "nothing on but current scene " << s.cur;
    }
    if (s.on.count(s.cur) == 0) {
        return ::testing::AssertionFailure() << "current scene " << s.cur << " is not on";
    }
    int best = -1;
    for (int id : s.on) {
        auto it = s.prio.find(id);
        best = std::max(best, it == s.prio.end() ? 0 : it->second);
    }
    const int cur = s.prio.count(s.cur) ? s.prio.at(s.cur) : 0;
    if (cur != best) {
        return ::testing::AssertionFailure()
               << "current scene " << s.cur << " has priority " << cur << ", best on is " << best;
    }
    return ::testing::AssertionSuccess();
}

TEST_F(ServerSceneTest, ConcurrentSwitchesKeepTheBestSceneCurrent) {
    // 4122 (150) and 4123 (70, tied with 4121) join the built-ins and governor scenes.
    start(kSceneCommands + scene(4122, "<t101>150</t101>") + scene(4123, "<t101>70</t101>"));
    const std::vector<int> ids = {4118, 4119, 4120, 4121, 4122, 4123, 4230, 4240, 4250, 4260};
    constexpr int kThreads = 4;
    constexpr int kSwitchesPerThread = 300;

    std::atomic<bool> done{false};
    std::atomic<int> violations{0};
    std::thread checker([&] {
        while (!done.load()) {
            if (!currentIsBest(snapshot(mServer.get()))) {
                ++violations;
            }
            std::this_thread::yield();
        }
    });
    std::vector<std::thread> workers;
    for (int t = 0; t < kThreads; ++t) {
        workers.emplace_back([&, t] {
            std::mt19937 rng(1234 + t);
            for (int i = 0; i < kSwitchesPerThread; ++i) {
                const int id = ids[rng() % ids.size()];
                const int value = (rng() % 2) ? kOn : kOff;
                mServer->velmoraEvent(id, "", 1, &value);
                if (t == 0 && i % 97 == 96) {
                    mServer->velmoraEvent(kClientRestart, "", 0, nullptr);
                }
            }
        });
    }
    // Reloads rebuild the priority table (parser write lock, then mMutex) while switches run
    // (mMutex released before the parser's read lock is taken): a lock-order slip hangs here.
    workers.emplace_back([&] {
        for (int i = 0; i < 10; ++i) {
            EXPECT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), 0);
            std::this_thread::yield();
        }
    });
    for (auto& w : workers) {
        w.join();
    }
    done = true;
    checker.join();

    EXPECT_EQ(violations.load(), 0);
    const SceneState last = state();
    EXPECT_TRUE(currentIsBest(last));
    // Switching everything off leaves no scene; the last scene applied is withdrawn last.
    steps();
    for (int id : ids) {
        off(id);
    }
    EXPECT_TRUE(state().on.empty());
    EXPECT_EQ(state().cur, 0);
    const Steps tail = steps();
    if (last.cur != 0) {
        ASSERT_FALSE(tail.empty());
        EXPECT_EQ(tail.back().payload, std::vector<int>({kOff}));
    }
}

}  // namespace
}  // namespace fake
}  // namespace velmora
