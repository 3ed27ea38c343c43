// Special scenes through velmoraEvent: which scene is withdrawn and which applied, in which
// order and with which payload, what is returned and logged, and the scene state the server
// keeps across platform failures, client restarts and concurrent switches.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <map>
#include <ostream>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "config/Action.h"
#include "platform/VelmoraPlat.h"
#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {
namespace {

constexpr int kOn = 0;
constexpr int kOff = -1;
constexpr int kClientRestart = 20224;

// One doAction call as the platform saw it.
struct Step {
    int cmdId;
    std::vector<int> payload;
    bool operator==(const Step& o) const { return cmdId == o.cmdId && payload == o.payload; }
};

std::ostream& operator<<(std::ostream& os, const Step& s) {
    os << (s.payload == std::vector<int>{kOn}    ? "apply "
           : s.payload == std::vector<int>{kOff} ? "withdraw "
                                                 : "payload? ")
       << s.cmdId;
    return os;
}

Step apply(int cmdId) {
    return {cmdId, {kOn}};
}
Step withdraw(int cmdId) {
    return {cmdId, {kOff}};
}
using Steps = std::vector<Step>;

std::string scene(int cmdId, const std::string& body = "", int duration = 0) {
    return "<cmd id=\"" + std::to_string(cmdId) + "\" name=\"scene_" + std::to_string(cmdId) +
           "\"><act><duration>" + std::to_string(duration) + "</duration>" + body + "</act></cmd>";
}

std::string govScene(int cmdId, int priority) {
    return scene(cmdId, "<s_priority>" + std::to_string(priority) + "</s_priority>");
}

// Built-in scenes 4118 (100), 4119 (200), 4120 (20), 4121 (70); governor scenes 4230 and 4240
// (50 each), 4250 (30) and 4260 (300, above 4119); 4130 is configured without a priority.
const std::string kScenes = scene(4118, "<t1>1500</t1>") + scene(4119) + scene(4120) + scene(4121) +
                            govScene(4230, 50) + govScene(4240, 50) + govScene(4250, 30) +
                            govScene(4260, 300) + scene(4130, "<t1>1</t1>");

struct SceneState {
    int cur;
    std::set<int32_t> on;
    std::map<int32_t, int32_t> prio;
};

SceneState snapshot(VelmoraServer* s) {
    android::Mutex::Autolock lock(s->mMutex);
    return {s->mCurSpecialCmdId, s->mOnEventSet, s->mPriorityMap};
}

class ServerSceneTest : public ServerTest {
  protected:
    void start(const std::string& extra = kScenes) {
        ASSERT_EQ(startServer(extra), 0);
        executor().clear();
        LogCapture::clear();
    }
    int on(int cmdId) { return mServer->velmoraEvent(cmdId, "", 1, &kOn); }
    int off(int cmdId) { return mServer->velmoraEvent(cmdId, "", 1, &kOff); }
    int restart() { return mServer->velmoraEvent(kClientRestart, "", 0, nullptr); }
    // The doAction calls recorded since the last call, then forgets them.
    Steps steps() {
        Steps out;
        for (const ExecutorCall& c : executor().calls(Op::DoAction)) {
            out.push_back({c.id, c.payload});
        }
        executor().clear();
        return out;
    }
    SceneState state() { return snapshot(mServer.get()); }
};

TEST_F(ServerSceneTest, HigherSceneTakesOverAndHandsBack) {
    start();
    EXPECT_EQ(on(4118), 0);
    EXPECT_EQ(steps(), Steps({apply(4118)}));
    EXPECT_EQ(on(4119), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118), apply(4119)}));
    EXPECT_EQ(state().cur, 4119);
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
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().on, std::set<int32_t>({4118, 4120, 4121}));
    EXPECT_EQ(state().cur, 4118);

    // The best waiting scene (4121, 70) comes next, then 4120 (20).
    EXPECT_EQ(off(4118), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118), apply(4121)}));
    EXPECT_EQ(off(4121), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4121), apply(4120)}));
}

TEST_F(ServerSceneTest, WaitingSceneSwitchedOffLeavesThePlatformAlone) {
    start();
    ASSERT_EQ(on(4118), 0);
    ASSERT_EQ(on(4120), 0);
    steps();
    EXPECT_EQ(off(4120), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().on, std::set<int32_t>({4118}));
    // A scene that was never on is just as harmless.
    EXPECT_EQ(off(4121), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().cur, 4118);
}

TEST_F(ServerSceneTest, SwitchingTheCurrentSceneOnAgainDoesNothing) {
    start();
    ASSERT_EQ(on(4119), 0);
    steps();
    EXPECT_EQ(on(4119), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().cur, 4119);
    EXPECT_EQ(state().on, std::set<int32_t>({4119}));
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

TEST_F(ServerSceneTest, GovernorScenesWaitUnderOtherScenes) {
    start();
    ASSERT_EQ(on(4118), 0);
    steps();
    EXPECT_EQ(on(4230), 0);
    EXPECT_EQ(on(4250), 0);
    EXPECT_EQ(off(4250), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().cur, 4118);
}

TEST_F(ServerSceneTest, ClientRestartWithdrawsTheCurrentSceneAndForgetsTheRest) {
    start();
    ASSERT_EQ(on(4118), 0);
    ASSERT_EQ(on(4120), 0);
    steps();
    const auto prioBefore = state().prio;

    EXPECT_EQ(restart(), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118)}));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO,
                                "client may rebooted, clean special scene set, cmdId is 20224"));
    EXPECT_EQ(state().cur, 0);
    EXPECT_TRUE(state().on.empty());
    EXPECT_EQ(state().prio, prioBefore);

    // 4120 was dropped with the set: switching it off is a no-op, and the next scene is
    // applied alone.
    EXPECT_EQ(off(4120), 0);
    EXPECT_EQ(on(4121), 0);
    EXPECT_EQ(steps(), Steps({apply(4121)}));
}

TEST_F(ServerSceneTest, ClientRestartWithoutCurrentSceneDoesNothing) {
    start();
    EXPECT_EQ(restart(), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(LogCapture::countContaining("client may rebooted"), 0);
}

TEST_F(ServerSceneTest, ClientRestartPassesTheWithdrawResultThrough) {
    start();
    ASSERT_EQ(on(4119), 0);
    executor().setResult(Op::DoAction, 9);
    EXPECT_EQ(restart(), 9);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4119"));
    EXPECT_EQ(state().cur, 0);
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

TEST_F(ServerSceneTest, UnparsableSceneIsNotDispatched) {
    start();
    EXPECT_EQ(on(4131), 2);
    EXPECT_TRUE(
        LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doParse failed! cmdId=4131, errno=1"));
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().on, std::set<int32_t>());
}

TEST_F(ServerSceneTest, DisabledSceneIsNotDispatched) {
    start(scene(4118, "", -1));
    EXPECT_EQ(on(4118), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(state().cur, 0);
}

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
}

TEST_F(ServerSceneTest, ScenesWithoutExecutorFail) {
    start();
    env().lastPlat->mExecutorPtr = nullptr;
    EXPECT_EQ(on(4118), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraEvent doAction failed! cmdId=4118"));
    EXPECT_EQ(state().cur, 4118);
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
    start(kScenes + scene(4122, "<t101>150</t101>") + scene(4123, "<t101>70</t101>"));
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
