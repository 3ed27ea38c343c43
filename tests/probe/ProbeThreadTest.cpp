// The probe worker and its queues: when boosts and withdrawals reach the platform, and what the
// queue operations do with the worker's lock held by the test (so that the worker cannot make
// a pass in between and the outcome does not depend on timing).
#include <utils/Mutex.h>

#include "tests/probe/ProbeFixture.h"

namespace velmora {
namespace fake {
namespace {

using android::Mutex;

class ProbeThreadTest : public ProbeFixture {};

TEST_F(ProbeThreadTest, WithdrawsAfterLifetimeAndDropsEntry) {
    startHandler();
    const auto queued = Clock::now();
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(12, 34);
    }
    ASSERT_TRUE(mExecutor.waitFor(Op::ProbeTid, 2, kBoostDelay + kBoostLifetime + kTolerance));

    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{34, 0}, {34, -1}}));
    const auto boosted = tidCallTime(34, 0);
    const auto withdrawn = tidCallTime(34, -1);
    EXPECT_GE(withdrawn - queued, kBoostDelay + kBoostLifetime);
    EXPECT_LE(withdrawn - boosted, kBoostLifetime + kTolerance);
    ASSERT_TRUE(mExecutor.waitFor(Op::DoAction, 2, kTolerance));
    const auto actions = mExecutor.calls(Op::DoAction);
    EXPECT_EQ(actions[1].payload, (std::vector<int>{-1}));

    EXPECT_TRUE(waitUntil([&] { return queuedCount() == 0; }));
    EXPECT_EQ(mExecutor.calls().size(), 4u);
}

// The worker sleeps for the remaining delay of the smallest pending thread id even when a
// larger one falls due earlier; both are then boosted in the same pass.
TEST_F(ProbeThreadTest, SleepsForSmallestPendingThreadId) {
    startHandler();
    Clock::time_point smallQueued;
    {
        // Holding the lock keeps the worker from looking at tid 9 alone.
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(1, 9);
        usleep(2000);
        smallQueued = Clock::now();
        thread().addItemToQueue(1, 5);
    }
    ASSERT_TRUE(mExecutor.waitFor(Op::ProbeTid, 2, kBoostDelay + kTolerance));

    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{9, 0}, {5, 0}}));
    EXPECT_GE(tidCallTime(9, 0) - smallQueued, kBoostDelay);
}

TEST_F(ProbeThreadTest, WaitingThreadWithdrawnNeverReachesPlatform) {
    startHandler();
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(12, 34);
        thread().moveItemToUnboostQueue(34);
        EXPECT_EQ(waitTimestampLocked(34), 0);
    }
    EXPECT_TRUE(waitUntil([&] { return queuedCount() == 0; }));
    EXPECT_TRUE(mExecutor.calls().empty());
}

TEST_F(ProbeThreadTest, ThreadIdZeroIsMovedButNeverSentByWorker) {
    startHandler();
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(1, 0);
    }
    ASSERT_TRUE(waitUntil([&] { return boostedTimestamp(0) > 0; }, kBoostDelay + kTolerance));
    const int64_t boostedAt = boostedTimestamp(0);
    EXPECT_EQ(waitTimestamp(0), -1);

    // Past its lifetime the entry expires like any other, without a withdrawal on the
    // platform, and the worker goes back to waiting instead of polling for it forever.
    ASSERT_TRUE(waitUntil([&] { return boostedTimestamp(0) == -1; }, kBoostLifetime + kTolerance));
    const auto expiry = Clock::time_point(std::chrono::nanoseconds(boostedAt)) + kBoostLifetime;
    EXPECT_GE(Clock::now(), expiry);
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
    Mutex::Autolock lock(thread().mLock);
    thread().addItemToQueue(1, 34);
    const int64_t first = waitTimestampLocked(34);
    ASSERT_GT(first, 0);
    usleep(2000);
    thread().addItemToQueue(1, 34);
    EXPECT_EQ(waitTimestampLocked(34), first);
    EXPECT_EQ(thread().mWaitQueue.size(), 1u);

    thread().moveItemToUnboostQueue(34);
    thread().addItemToQueue(1, 34);  // a withdrawn entry is replaced by a fresh one
    EXPECT_GT(waitTimestampLocked(34), first);
    EXPECT_EQ(thread().mWaitQueue.size(), 1u);
    EXPECT_TRUE(mExecutor.calls().empty());
}

TEST_F(ProbeThreadTest, RefusedThreadGetsNoActionButStillMoves) {
    mExecutor.setResult(Op::ProbeTid, -3);
    startHandler();
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(12, 34);
    }
    ASSERT_TRUE(mExecutor.waitFor(Op::ProbeTid, 1, kBoostDelay + kTolerance));
    EXPECT_TRUE(waitUntil([&] { return boostedTimestamp(34) > 0; }));
    EXPECT_TRUE(mExecutor.calls(Op::DoAction).empty());
    EXPECT_EQ(LogCapture::countContaining("doAction failed"), 0);
}

TEST_F(ProbeThreadTest, FailedActionsAreLoggedAtDebug) {
    mExecutor.setResult(Op::DoAction, 5);
    startHandler();
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(12, 34);
    }
    ASSERT_TRUE(mExecutor.waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));
    EXPECT_TRUE(waitUntil([&] { return boostedTimestamp(34) > 0; }));
    {
        Mutex::Autolock lock(thread().mLock);
        thread().moveItemToUnboostQueue(34);
    }
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, "handleBoostItem doAction failed"), 1);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_DEBUG, "handleUnBoostItem doAction failed"), 1);
    EXPECT_EQ(tidCalls(), (std::vector<TidCall>{{34, 0}, {34, -1}}));
}

TEST_F(ProbeThreadTest, MissingExecutorIsNotAnError) {
    mPlat.mExecutorPtr = nullptr;
    startHandler();
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(12, 34);
    }
    EXPECT_TRUE(waitUntil([&] { return boostedTimestamp(34) > 0; }, kBoostDelay + kTolerance));
    {
        Mutex::Autolock lock(thread().mLock);
        thread().moveItemToUnboostQueue(34);
    }
    EXPECT_TRUE(mExecutor.calls().empty());
    EXPECT_EQ(LogCapture::countContaining("doAction failed"), 0);
}

// Duration of the probe action handed to the constructor -> duration the platform sees.
class ProbeActionCapTest : public ProbeFixture,
                           public ::testing::WithParamInterface<std::pair<int, int>> {};

TEST_P(ProbeActionCapTest, StartupActionDurationIsCappedAt100) {
    startHandler(makeProbeAction(GetParam().first));
    {
        Mutex::Autolock lock(thread().mLock);
        thread().addItemToQueue(12, 34);
    }
    ASSERT_TRUE(mExecutor.waitFor(Op::DoAction, 1, kBoostDelay + kTolerance));
    EXPECT_EQ(mExecutor.calls(Op::DoAction)[0].duration, GetParam().second);
}

INSTANTIATE_TEST_SUITE_P(Durations, ProbeActionCapTest,
                         ::testing::Values(std::make_pair(8, 8), std::make_pair(100, 100),
                                           std::make_pair(101, 100), std::make_pair(5000, 100)));

}  // namespace
}  // namespace fake
}  // namespace velmora
