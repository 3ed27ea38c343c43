// What the server traces: the slice of each host entry point, and the counter tracks of the
// applied scene, the merged frequency limits, the scheduler-group levels and the probe boosts,
// as a recording trace sink receives them.
#include <functional>
#include <string>
#include <vector>

#include "tests/fakes/FakeProbeClock.h"
#include "tests/fakes/RecordingTraceSink.h"
#include "tests/fakes/ServerTest.h"
#include "trace/Trace.h"

namespace velmora {
namespace fake {
namespace {

using Ints = std::vector<int>;
using Values = std::vector<int64_t>;
using Names = std::vector<std::string>;

constexpr int kOn = 0;
constexpr int kOff = -1;

const char* const kTraceCommands =
    "<cmd id=\"4118\" name=\"scene_4118\"><act><duration>0</duration></act></cmd>"
    "<cmd id=\"4119\" name=\"scene_4119\"><act><duration>0</duration></act></cmd>"
    "<cmd id=\"4500\" name=\"top_app_up\"><act><duration>0</duration><t53>30</t53></act></cmd>";

class ServerTraceTest : public ServerTest {
protected:
    void SetUp() override {
        ServerTest::SetUp();
        FakeProbeClock::install();  // the probe worker in virtual time
        Trace::setSink(&mSink);
        ASSERT_EQ(startServer(kTraceCommands), 0);
        mSink.clear();
    }
    void TearDown() override {
        ServerTest::TearDown();  // stops the probe worker before the sink and its clock go
        Trace::setSink(nullptr);
        FakeProbeClock::uninstall();
    }

    RecordingTraceSink mSink;
};

void event(VelmoraServer& server, int cmdId, int word) {
    server.velmoraEvent(cmdId, "", 1, &word);
}

void setConfig(VelmoraServer& server, int clientId, Ints tags, Ints configs) {
    server.velmoraSetConfig(clientId, static_cast<int>(tags.size()), tags.data(), configs.data());
}

struct SliceCase {
    const char* label;
    std::function<void(VelmoraServer&)> call;
    Names slices;
};

class EntryPointSliceTest : public ServerTraceTest,
                            public ::testing::WithParamInterface<SliceCase> {};

TEST_P(EntryPointSliceTest, EachEntryPointIsOneSliceNamedWithItsId) {
    GetParam().call(*mServer);
    EXPECT_EQ(mSink.slices(), GetParam().slices);
}

INSTANTIATE_TEST_SUITE_P(
    Calls, EntryPointSliceTest,
    ::testing::Values(SliceCase{"reload",
                                [](VelmoraServer& s) { s.velmoraEvent(20230, "", 0, nullptr); },
                                {"velmoraEvent cmdId=20230", "reload", "<end>", "<end>"}},
                      // The notification hands its word on as a feature-switch request of client 0.
                      SliceCase{"notification",
                                [](VelmoraServer& s) { event(s, 20225, 0); },
                                {"velmoraEvent cmdId=20225", "velmoraSetConfig clientId=0", "<end>",
                                 "<end>"}}),
    [](const ::testing::TestParamInfo<SliceCase>& info) { return info.param.label; });

struct CounterCase {
    const char* label;
    std::function<void(VelmoraServer&)> calls;
    const char* track;
    Values values;
};

class CounterTrackTest : public ServerTraceTest,
                         public ::testing::WithParamInterface<CounterCase> {};

TEST_P(CounterTrackTest, TrackFollowsWhatThePlatformAccepted) {
    GetParam().calls(*mServer);
    EXPECT_EQ(mSink.counter(GetParam().track), GetParam().values);
}

INSTANTIATE_TEST_SUITE_P(
    Decisions, CounterTrackTest,
    ::testing::Values(
        // A client restart drops the applied scene (switching: ReplayEndToEndTest's timeline).
        CounterCase{"client_restart",
                    [](VelmoraServer& s) {
                        event(s, 4118, kOn);
                        s.velmoraEvent(20224, "", 0, nullptr);
                    },
                    "velmora.scene",
                    {4118, 0}},
        // The merged cap, lowest of the clients: JN's 1.2 GHz under KX's 1.5, then KX's again.
        CounterCase{"client_cap",
                    [](VelmoraServer& s) {
                        setConfig(s, 1, {2}, {1500000});
                        setConfig(s, 2, {2}, {1200000});
                        setConfig(s, 2, {2}, {0});
                    },
                    "velmora.freq.little_cpu_max",
                    {1500000, 1200000, 1500000}},
        // Packed client level: group 3 (top app) in the high half, level -10 + 20 in the low.
        CounterCase{"client_level",
                    [](VelmoraServer& s) { setConfig(s, 1, {42}, {(3 << 16) | 10}); },
                    "velmora.sched.top_app",
                    {-10}}),
    [](const ::testing::TestParamInfo<CounterCase>& info) { return info.param.label; });

// What the platform refused does not show on the tracks.
TEST_F(ServerTraceTest, RefusedLimitsAndLevelsLeaveTheTracksAlone) {
    executor().setResult(Op::SetConfig, 1);
    executor().setResult(Op::SchedLevel, 1);
    setConfig(*mServer, 1, {2}, {1500000});
    mServer->velmoraEvent(4500, "", 0, nullptr);
    EXPECT_EQ(mSink.counter("velmora.freq.little_cpu_max"), Values{});
    EXPECT_EQ(mSink.counter("velmora.sched.top_app"), Values{});
}

// A probed thread is boosted 8 ms after its probe, until withdrawn or 256 ms later.
TEST_F(ServerTraceTest, ProbeTrackCountsBoostsUntilWithdrawnOrExpired) {
    const auto probe = [this](const char* msg, int state) {
        mServer->velmoraEvent(4116, msg, 1, &state);
    };
    const auto advance = [](int ms) { FakeProbeClock::last().advance(ms); };
    probe("pid=12|tid=34", kOn);
    probe("pid=12|tid=35", kOn);
    advance(7);
    EXPECT_EQ(mSink.counter("velmora.probe.boosted"), Values{});
    advance(1);
    EXPECT_EQ(mSink.counter("velmora.probe.boosted"), (Values{1, 2}));
    probe("pid=12|tid=35", kOff);
    advance(255);
    EXPECT_EQ(mSink.counter("velmora.probe.boosted"), (Values{1, 2, 1}));
    advance(1);
    EXPECT_EQ(mSink.counter("velmora.probe.boosted"), (Values{1, 2, 1, 0}));
}

}  // namespace
}  // namespace fake
}  // namespace velmora
