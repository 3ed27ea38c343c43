// Probe events (4116) through velmoraEvent: what reaches the platform and when, the statuses
// the host gets back, and the probe action taken from the configuration at start-up and on
// reload. The worker runs on the system's clock here: these are the real-time tests of it.
#include <string>
#include <vector>

#include "probe/ProbeHandler.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr milliseconds kBoostDelay{8};
// Only bounds how long a broken worker is waited for.
constexpr milliseconds kTolerance{10000};

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
    int probe(const char* msg, int state) { return mServer->velmoraEvent(kProbe, msg, 1, &state); }
};

TEST_F(ServerProbeTest, BoostsAfterDelayWithConfiguredActionAndWithdrawsOnRequest) {
    ASSERT_EQ(startServer(), 0);
    executor().clear();
    const auto queued = Clock::now();
    EXPECT_EQ(probe("pid=12|tid=34", 0), 0);
    ASSERT_TRUE(executor().waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));

    const auto calls = executor().calls();
    ASSERT_EQ(calls.size(), 2u);
    // Thread 34 is selected before the action runs, not before the delay.
    EXPECT_EQ(calls[0].op, Op::ProbeTid);
    EXPECT_EQ(calls[0].tid, 34u);
    EXPECT_EQ(calls[0].state, 0);
    EXPECT_GE(calls[0].when - queued, kBoostDelay);
    EXPECT_EQ(calls[1].op, Op::DoAction);
    EXPECT_EQ(calls[1].id, kProbe);
    EXPECT_EQ(calls[1].name, "probe");
    EXPECT_EQ(calls[1].duration, 8);
    EXPECT_EQ(calls[1].tagValues, (std::vector<int>{1, 1000}));
    EXPECT_EQ(calls[1].payload, (std::vector<int>{0}));

    EXPECT_EQ(probe("pid=12|tid=34", -1), 0);
    const auto withdrawn = executor().calls();
    ASSERT_EQ(withdrawn.size(), 4u);
    EXPECT_EQ(withdrawn[2].tid, 34u);
    EXPECT_EQ(withdrawn[2].state, -1);
    EXPECT_EQ(withdrawn[3].payload, (std::vector<int>{-1}));
}

// The action of a reload replaces the probe action as it is: the start-up cap does not apply.
TEST_F(ServerProbeTest, ReloadedActionIsNotCapped) {
    ASSERT_EQ(startServer(), 0);
    writeCustConfig(policyXml(commandsWithProbe(500, 2000)));
    EXPECT_EQ(mServer->velmoraEvent(kReload, "", 0, nullptr), 0);
    executor().clear();
    EXPECT_EQ(probe("pid=12|tid=35", 0), 0);
    ASSERT_TRUE(executor().waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));
    const auto action = executor().calls(Op::DoAction)[0];
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

}  // namespace
}  // namespace fake
}  // namespace velmora
