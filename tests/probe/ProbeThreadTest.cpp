// The probe worker and its queues on a virtual clock: the exact instants boosts and withdrawals
// reach the platform, and what the queue operations do with the worker's lock held by the test
// (so that the worker cannot make a pass in between).
#include <utils/Mutex.h>

#include "tests/probe/ProbeFixture.h"

namespace velmora {
namespace fake {
namespace {

using android::Mutex;

class ProbeThreadTest : public ProbeFixture {
protected:
    void queue(int pid, uint32_t tid) {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(pid, tid);
    }
    void withdraw(uint32_t tid) {
        Mutex::Autolock lock(thread().mLock);
        thread().moveItemToUnboostQueue(tid);
    }
};

TEST_F(ProbeThreadTest, BoostsAfterTheDelayAndWithdrawsAtTheEndOfTheLifetime) {
    startHandler();
    queue(12, 34);
    advance(kBoostDelayMs - 1);
    EXPECT_TRUE(mExecutor.calls().empty());
    advance(1);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{34, 0}}));
    advance(kBoostLifetimeMs - 1);
    EXPECT_EQ(tidCalls().size(), 1u);
    advance(1);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{34, 0}, {34, -1}}));
    const auto actions = mExecutor.calls(Op::DoAction);
    ASSERT_EQ(actions.size(), 2u);
    EXPECT_EQ(actions[0].payload, (std::vector<int>{0}));
    EXPECT_EQ(actions[1].payload, (std::vector<int>{-1}));
    advance(1);
    EXPECT_EQ(queuedCount(), 0u);
    EXPECT_EQ(mExecutor.calls().size(), 4u);
}

// The worker sleeps for the remaining delay of the last pending item it visits (the smallest
// thread id) even when a larger one falls due earlier; both are then boosted in the same pass.
TEST_F(ProbeThreadTest, SleepsForSmallestPendingThreadId) {
    startHandler();
    queue(1, 20);
    advance(1);
    queue(1, 9);
    advance(1);
    queue(1, 5);
    advance(kBoostDelayMs - 2);  // 20 is boosted; 9 is due in 1 ms, 5 in 2
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{20, 0}}));
    advance(1);
    EXPECT_EQ(tidCalls().size(), 1u);
    advance(1);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{20, 0}, {9, 0}, {5, 0}}));
}

TEST_F(ProbeThreadTest, WaitingThreadWithdrawnNeverReachesPlatform) {
    startHandler();
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(12, 34);
        thread().moveItemToUnboostQueue(34);
        EXPECT_EQ(waitTimestampLocked(34), 0);
    }
    advance(kBoostDelayMs);
    EXPECT_EQ(queuedCount(), 0u);
    EXPECT_TRUE(mExecutor.calls().empty());
}

// Thread id 0 moves through the queues but never reaches the platform; past its lifetime it
// expires like any other, and the worker goes back to waiting instead of polling for it.
TEST_F(ProbeThreadTest, ThreadIdZeroIsMovedButNeverSentByWorker) {
    startHandler();
    queue(1, 0);
    advance(kBoostDelayMs);
    EXPECT_GT(boostedTimestamp(0), 0);
    EXPECT_EQ(waitTimestamp(0), -1);
    advance(kBoostLifetimeMs - 1);
    EXPECT_GT(boostedTimestamp(0), 0);
    advance(2);
    EXPECT_EQ(boostedTimestamp(0), -1);
    EXPECT_TRUE(mExecutor.calls().empty());
}

TEST_F(ProbeThreadTest, ThreadOfBoostedProcessIsBoostedAtOnce) {
    startHandler();
    Mutex::Autolock lock(thread().mLock);
    thread().addItemToBoostedQueueLocked(10);  // main thread of process 10, no platform call
    thread().addItemToWaitQueue(20);
    EXPECT_TRUE(mExecutor.calls().empty());

    thread().addItemToQueue(10, 20);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{20, 0}}));
    ASSERT_EQ(mExecutor.calls(Op::DoAction).size(), 1u);
    EXPECT_EQ(mExecutor.calls(Op::DoAction)[0].payload, (std::vector<int>{0}));
    EXPECT_EQ(waitTimestampLocked(20), 0);  // the wait entry is withdrawn
    const int64_t boostedAt = boostedTimestampLocked(20);
    EXPECT_GT(boostedAt, 0);

    // Asked again: boosted again, but the lifetime keeps running from the first boost.
    thread().addItemToQueue(10, 20);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{20, 0}, {20, 0}}));
    EXPECT_EQ(boostedTimestampLocked(20), boostedAt);
}

TEST_F(ProbeThreadTest, WithdrawnMainThreadStillMarksProcessBoosted) {
    startHandler();
    Mutex::Autolock lock(thread().mLock);
    thread().addItemToBoostedQueueLocked(10);
    thread().moveItemToUnboostQueue(10);
    thread().addItemToQueue(10, 21);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{10, -1}, {21, 0}}));
    EXPECT_GT(boostedTimestampLocked(21), 0);
}

TEST_F(ProbeThreadTest, RepeatedRequestKeepsTimerUntilWithdrawn) {
    startHandler();
    queue(1, 34);
    const int64_t first = waitTimestamp(34);
    ASSERT_GT(first, 0);
    advance(2);
    queue(1, 34);
    EXPECT_EQ(waitTimestamp(34), first);
    withdraw(34);
    queue(1, 34);  // a withdrawn entry is replaced by a fresh one
    EXPECT_GT(waitTimestamp(34), first);
    EXPECT_EQ(queuedCount(), 1u);
    EXPECT_TRUE(mExecutor.calls().empty());
}

// What the platform answers decides what else it is asked and what is logged; the queues move
// on regardless. Rows: setProbeTid result, doAction result, executor present.
struct PlatformRow {
    int tidResult;
    int actionResult;
    bool executor;
    size_t actions;  // doAction calls for a boost and its withdrawal
    int failureLogs;
};

class ProbePlatformTest : public ProbeThreadTest,
                          public ::testing::WithParamInterface<PlatformRow> {};

TEST_P(ProbePlatformTest, PlatformAnswersDoNotStopTheQueues) {
    const PlatformRow& row = GetParam();
    mExecutor.setResult(Op::ProbeTid, row.tidResult);
    mExecutor.setResult(Op::DoAction, row.actionResult);
    if (!row.executor) {
        mPlat.mExecutorPtr = nullptr;
    }
    startHandler();
    queue(12, 34);
    advance(kBoostDelayMs);
    EXPECT_GT(boostedTimestamp(34), 0);
    withdraw(34);
    EXPECT_EQ(mExecutor.calls(Op::ProbeTid).size(), row.executor ? 2u : 0u);
    EXPECT_EQ(mExecutor.calls(Op::DoAction).size(), row.actions);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, "handleBoostItem doAction failed"),
              row.failureLogs);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, "handleUnBoostItem doAction failed"),
              row.failureLogs);
}

INSTANTIATE_TEST_SUITE_P(Rows, ProbePlatformTest,
                         ::testing::Values(PlatformRow{0, 0, true, 2, 0},
                                           PlatformRow{-3, 0, true, 0, 0},  // refused thread
                                           PlatformRow{0, 5, true, 2, 1},   // failed action
                                           PlatformRow{0, 0, false, 0, 0}));

// Duration of the probe action handed to the constructor -> duration the platform sees.
class ProbeActionCapTest : public ProbeThreadTest,
                           public ::testing::WithParamInterface<std::pair<int, int>> {};

TEST_P(ProbeActionCapTest, StartupActionDurationIsCappedAt100) {
    startHandler(makeProbeAction(GetParam().first));
    queue(12, 34);
    advance(kBoostDelayMs);
    ASSERT_EQ(mExecutor.calls(Op::DoAction).size(), 1u);
    EXPECT_EQ(mExecutor.calls(Op::DoAction)[0].duration, GetParam().second);
}

INSTANTIATE_TEST_SUITE_P(Durations, ProbeActionCapTest,
                         ::testing::Values(std::make_pair(8, 8), std::make_pair(100, 100),
                                           std::make_pair(101, 100), std::make_pair(5000, 100)));

}  // namespace
}  // namespace fake
}  // namespace velmora
