// The probe handler: what handle() returns and logs for each kind of event, what reaches the
// platform, action replacement, and that a stopped or deleted handler leaves the platform alone.
#include <climits>

#include "tests/probe/ProbeFixture.h"

namespace velmora {
namespace fake {
namespace {

class ProbeHandlerTest : public ProbeFixture {};

// An action record that counts its destructions, to see who frees the probe action chain.
struct CountedAction : Action {
    explicit CountedAction(int* destroyed) : mDestroyed(destroyed) {}
    ~CountedAction() override { ++*mDestroyed; }
    int* mDestroyed;
};

struct RejectCase {
    const char* name;
    const char* msg;
    unsigned int payloadNum;
    bool nullPayload;
    int state;
    int expected;
    int prio;
    const char* log;
};

class ProbeHandlerRejectTest : public ProbeFixture,
                               public ::testing::WithParamInterface<RejectCase> {};

TEST_P(ProbeHandlerRejectTest, ReturnsStatusLogsAndQueuesNothing) {
    const RejectCase& c = GetParam();
    startHandler();
    const int state = c.state;
    EXPECT_EQ(mHandler->handle(c.msg, c.payloadNum, c.nullPayload ? nullptr : &state), c.expected);
    EXPECT_EQ(LogCapture::count(c.prio, c.log), 1);
    EXPECT_EQ(queuedCount(), 0u);
    EXPECT_TRUE(mExecutor.calls().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ProbeHandlerRejectTest,
    ::testing::Values(
        // Nothing to read at all: the scanner reports end of input.
        RejectCase{"Empty", "", 1, false, 0, -1, ANDROID_LOG_ERROR,
                   "velmora: get msg info failed!"},
        // Fields in the wrong order: the first literal already fails.
        RejectCase{"SwappedFields", "tid=34|pid=12", 1, false, 0, 0, ANDROID_LOG_ERROR,
                   "velmora: get msg info failed!"},
        // The message is checked before the payload.
        RejectCase{"BadMessageAndPayload", "pid=12", 2, false, 0, 1, ANDROID_LOG_ERROR,
                   "velmora: get msg info failed!"},
        RejectCase{"NoPayloadValues", "pid=12|tid=34", 0, false, 0, 2, ANDROID_LOG_ERROR,
                   "invalid payload, payloadNum=0"},
        // Only all bits set withdraws; the sign bit alone is just another bad state.
        RejectCase{"StateIntMin", "pid=12|tid=34", 1, false, INT_MIN, 2, ANDROID_LOG_DEBUG,
                   "error case: state=-2147483648, pid=12, tid=34\n"}),
    [](const ::testing::TestParamInfo<RejectCase>& info) { return info.param.name; });

TEST_F(ProbeHandlerTest, RepeatedStateZeroBoostsOnce) {
    startHandler();
    EXPECT_EQ(probe(12, 34, 0), 0);
    EXPECT_EQ(probe(12, 34, 0), 0);
    advance(kBoostDelayMs);
    EXPECT_EQ(probe(12, 34, 0), 0);  // already boosted: nothing to do
    advance(3 * kBoostDelayMs);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{34, 0}}));
}

TEST_F(ProbeHandlerTest, StateMinusOneWithdrawsBoostedThreadOnce) {
    startHandler();
    EXPECT_EQ(probe(12, 34, 0), 0);
    advance(kBoostDelayMs);

    // The withdrawal is made on the caller's thread, before handle() returns.
    EXPECT_EQ(probe(12, 34, -1), 0);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{34, 0}, {34, -1}}));
    EXPECT_EQ(mExecutor.calls(Op::DoAction).size(), 2u);

    // The worker drops the entry; neither a second withdrawal nor the lifetime calls again.
    advance(1);
    EXPECT_EQ(queuedCount(), 0u);
    EXPECT_EQ(probe(12, 34, -1), 0);
    advance(kBoostLifetimeMs);
    EXPECT_EQ(mExecutor.calls().size(), 4u);
}

TEST_F(ProbeHandlerTest, ActionChainsAreFreedOnUpdateAndWithHandler) {
    int first = 0;
    int second = 0;
    Action* chain = new CountedAction(&first);
    chain->mNext = new CountedAction(&first);
    startHandler(chain);

    Action* replacement = new CountedAction(&second);
    replacement->mNext = new CountedAction(&second);
    EXPECT_EQ(mHandler->updateProbeThread(replacement), 0);
    EXPECT_EQ(first, 2);
    EXPECT_EQ(second, 0);

    // Gone by the time the handler's deletion returns, not later on the worker.
    mHandler.reset();
    EXPECT_EQ(second, 2);
}

TEST_F(ProbeHandlerTest, WithoutWorkerEventsAreIgnoredAndUpdateFails) {
    startHandler();
    mHandler->stopProbeThread();
    mHandler->mProbeThreadPtr.clear();

    EXPECT_EQ(probe(12, 34, 0), 0);
    EXPECT_EQ(probe(12, 34, 7), 0);  // the state is not even looked at
    Action* action = makeProbeAction(8);
    EXPECT_EQ(mHandler->updateProbeThread(action), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "updateProbeThread:mProbeThreadPtr is NULL!"));
    delete action;  // refused: still the caller's
    EXPECT_TRUE(mExecutor.calls().empty());
}

// Once stopped, nothing reaches the platform any more, not even the immediate boost of a
// thread whose process is boosted: the platform object may be on its way out.
TEST_F(ProbeHandlerTest, StoppedHandlerLeavesPlatformAlone) {
    startHandler();
    EXPECT_EQ(probe(10, 10, 0), 0);
    advance(kBoostDelayMs);
    EXPECT_EQ(probe(12, 34, 0), 0);

    mHandler->stopProbeThread();
    mHandler->stopProbeThread();  // idempotent
    EXPECT_EQ(probe(10, 20, 0), 0);
    EXPECT_EQ(probe(10, 10, -1), 0);
    advance(kBoostLifetimeMs);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{10, 0}}));
}

}  // namespace
}  // namespace fake
}  // namespace velmora
