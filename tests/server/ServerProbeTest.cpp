// Probe events (4116) through velmoraEvent: what reaches the platform and when, the statuses
// the host gets back, the probe action taken from the configuration at start-up and on reload,
// and reloads racing with probe events and the worker.
#include <unistd.h>

#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include "probe/ProbeHandler.h"
#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {
namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr int kProbe = 4116;
constexpr int kReload = 20230;
constexpr milliseconds kBoostDelay{8};
// How late the worker (or the host threads of the race) may be on a loaded, sanitized build.
constexpr milliseconds kTolerance{250};

// kStartupCommands with the probe command's duration and parameter replaced.
std::string commandsWithProbe(int duration, int value) {
    std::string commands = kStartupCommands;
    const std::string probe = "<duration>8</duration><t1>1000</t1>";
    commands.replace(commands.find(probe), probe.size(),
                     "<duration>" + std::to_string(duration) + "</duration><t1>" +
                         std::to_string(value) + "</t1>");
    return commands;
}

class ServerProbeTest : public ServerTest {
protected:
    int startWithProbe(int duration, int value) {
        writeCustConfig(policyXml(commandsWithProbe(duration, value)));
        mServer = std::make_unique<VelmoraServer>();
        return mServer->init();
    }

    int probe(const char* msg, int state) { return mServer->velmoraEvent(kProbe, msg, 1, &state); }

    std::vector<std::pair<unsigned int, int>> tidCalls() const {
        std::vector<std::pair<unsigned int, int>> out;
        for (const auto& call : FakeEnv::get().executor.calls(Op::ProbeTid)) {
            out.emplace_back(call.tid, call.state);
        }
        return out;
    }
    using TidCalls = std::vector<std::pair<unsigned int, int>>;
};

TEST_F(ServerProbeTest, BoostsAfterDelayWithConfiguredActionAndWithdrawsOnRequest) {
    ASSERT_EQ(startServer(), 0);
    executor().clear();
    const auto queued = Clock::now();
    EXPECT_EQ(probe("pid=12|tid=34", 0), 0);
    ASSERT_TRUE(executor().waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));

    EXPECT_EQ(tidCalls(), (TidCalls{{34, 0}}));
    const auto calls = executor().calls();
    ASSERT_EQ(calls.size(), 2u);
    // The thread is selected before the action runs, neither before the delay nor long after.
    EXPECT_EQ(calls[0].op, Op::ProbeTid);
    EXPECT_GE(calls[0].when - queued, kBoostDelay);
    EXPECT_LE(calls[0].when - queued, kBoostDelay + kTolerance);
    EXPECT_EQ(calls[1].op, Op::DoAction);
    EXPECT_EQ(calls[1].id, kProbe);
    EXPECT_EQ(calls[1].name, "probe");
    EXPECT_EQ(calls[1].duration, 8);
    EXPECT_EQ(calls[1].tagValues, (std::vector<int>{1, 1000}));
    EXPECT_EQ(calls[1].payload, (std::vector<int>{0}));

    EXPECT_EQ(probe("pid=12|tid=34", -1), 0);
    EXPECT_EQ(tidCalls(), (TidCalls{{34, 0}, {34, -1}}));
    ASSERT_EQ(executor().calls(Op::DoAction).size(), 2u);
    EXPECT_EQ(executor().calls(Op::DoAction)[1].payload, (std::vector<int>{-1}));
}

TEST_F(ServerProbeTest, HandlerFailuresComeBackToHost) {
    ASSERT_EQ(startServer(), 0);
    executor().clear();
    EXPECT_EQ(probe("pid=12", 0), 1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmora: get msg info failed!"));
    EXPECT_EQ(probe("", 0), -1);
    EXPECT_EQ(probe("pid=12|tid=34", 3), 2);
    const int twoStates[2] = {0, 0};
    EXPECT_EQ(mServer->velmoraEvent(kProbe, "pid=12|tid=34", 2, twoStates), 2);
    EXPECT_EQ(mServer->velmoraEvent(kProbe, "pid=12|tid=34", 1, nullptr), 2);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "velmoraEvent do probe handle failed!"), 5);
    EXPECT_FALSE(executor().waitFor(Op::ProbeTid, 1, 3 * kBoostDelay));
}

TEST_F(ServerProbeTest, ThreadOfBoostedProcessSkipsDelay) {
    ASSERT_EQ(startServer(), 0);
    executor().clear();
    EXPECT_EQ(probe("pid=10|tid=10", 0), 0);
    ASSERT_TRUE(executor().waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));

    EXPECT_EQ(probe("pid=10|tid=20", 0), 0);
    // Already on the platform when the event returns.
    EXPECT_EQ(tidCalls(), (TidCalls{{10, 0}, {20, 0}}));
    EXPECT_EQ(executor().calls(Op::DoAction).size(), 2u);
}

TEST_F(ServerProbeTest, StartupActionIsCappedReloadedOneIsNot) {
    ASSERT_EQ(startWithProbe(500, 1000), 0);
    executor().clear();
    EXPECT_EQ(probe("pid=12|tid=34", 0), 0);
    ASSERT_TRUE(executor().waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));
    EXPECT_EQ(executor().calls(Op::DoAction)[0].duration, 100);

    writeCustConfig(policyXml(commandsWithProbe(500, 2000)));
    EXPECT_EQ(mServer->velmoraEvent(kReload, "", 0, nullptr), 0);
    EXPECT_EQ(probe("pid=12|tid=35", 0), 0);
    ASSERT_TRUE(executor().waitFor(Op::DoAction, 2, kBoostDelay + kTolerance));
    const auto action = executor().calls(Op::DoAction)[1];
    EXPECT_EQ(action.duration, 500);
    EXPECT_EQ(action.tagValues, (std::vector<int>{1, 2000}));
}

// Releasing the components while a thread is boosted and another waits: the worker is gone
// with them, so neither the pending boost nor the withdrawal ever reaches the platform.
TEST_F(ServerProbeTest, ReleasingComponentsStopsPendingProbeWork) {
    ASSERT_EQ(startServer(), 0);
    executor().clear();
    EXPECT_EQ(probe("pid=12|tid=34", 0), 0);
    ASSERT_TRUE(executor().waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));
    EXPECT_EQ(probe("pid=12|tid=35", 0), 0);

    mServer->deleteObject();
    const size_t before = executor().calls(Op::ProbeTid).size();
    EXPECT_FALSE(executor().waitFor(Op::ProbeTid, before + 1, 3 * kBoostDelay));
    EXPECT_EQ(probe("pid=12|tid=34", -1), 4);
}

// Reloads replace the probe action while host threads queue, boost and withdraw threads and
// the worker boosts them: every action the platform sees is one of the two configured ones,
// intact, and the reloaded one is in force afterwards.
TEST_F(ServerProbeTest, ReloadRacesWithProbeEventsAndWorker) {
    ASSERT_EQ(startServer(), 0);
    writeCustConfig(policyXml(commandsWithProbe(8, 2000)));
    executor().clear();
    // Keeps the action in use a little longer while the lock is held.
    executor().setActionHook([](const Action*) { usleep(100); });

    std::atomic<int> failures{0};
    std::thread reloader([&] {
        for (int i = 0; i < 20; ++i) {
            failures += mServer->velmoraEvent(kReload, "", 0, nullptr) != 0;
            usleep(500);
        }
    });
    std::vector<std::thread> probers;
    for (int p = 0; p < 2; ++p) {
        probers.emplace_back([&, p] {
            for (int i = 0; i < 150; ++i) {
                // Every tenth thread is its process's main thread, so later threads of that
                // process are boosted on the calling thread instead of the worker.
                const int pid = 100 + p * 100 + i / 10;
                const int tid = i % 10 == 0 ? pid : 1000 + p * 1000 + i;
                const std::string msg =
                    "pid=" + std::to_string(pid) + "|tid=" + std::to_string(tid);
                const int state = i % 3 == 2 ? -1 : 0;
                failures += mServer->velmoraEvent(kProbe, msg.c_str(), 1, &state) != 0;
                usleep(i % 4 == 0 ? 2000 : 200);
            }
        });
    }
    reloader.join();
    for (auto& t : probers) {
        t.join();
    }
    EXPECT_EQ(failures.load(), 0);

    const auto raced = executor().calls(Op::DoAction);
    EXPECT_FALSE(raced.empty());
    for (const auto& call : raced) {
        EXPECT_EQ(call.id, kProbe);
        EXPECT_EQ(call.name, "probe");
        EXPECT_EQ(call.duration, 8);
        EXPECT_TRUE(call.tagValues == (std::vector<int>{1, 1000}) ||
                    call.tagValues == (std::vector<int>{1, 2000}));
        EXPECT_TRUE(call.payload == std::vector<int>{0} || call.payload == std::vector<int>{-1});
    }

    // The probe action after the last reload: the action run right after selecting a fresh
    // thread (both happen under the worker's lock, so nothing comes in between).
    EXPECT_EQ(probe("pid=9998|tid=9999", 0), 0);
    std::vector<int> lastTagValues;
    const auto deadline = Clock::now() + kBoostDelay + kTolerance;
    while (lastTagValues.empty() && Clock::now() < deadline) {
        const auto calls = executor().calls();
        for (size_t i = 0; i + 1 < calls.size(); ++i) {
            if (calls[i].op == Op::ProbeTid && calls[i].tid == 9999 &&
                calls[i + 1].op == Op::DoAction) {
                lastTagValues = calls[i + 1].tagValues;
            }
        }
        usleep(1000);
    }
    EXPECT_EQ(lastTagValues, (std::vector<int>{1, 2000}));
}

}  // namespace
}  // namespace fake
}  // namespace velmora
