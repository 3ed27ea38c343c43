#include "probe/ProbeThread.h"

#include "config/Action.h"
#include "config/CommandIds.h"
#include "platform/PerfExecutor.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "trace/ServerTrace.h"

using android::Mutex;
using android::sp;

namespace {

constexpr int64_t kNsPerMs = 1000000;
constexpr int64_t kBoostLifetimeNs = velmora::kProbeBoostLifetimeMs * kNsPerMs;
// Cap of the start-up probe action's duration. A reloaded action is handed over as configured
// (update()), so the cap holds only until the first reload.
constexpr int32_t kMaxProbeDurationMs = velmora::kProbeDurationCapMs;
// Android's foreground priority: boosts must not lag behind the work they are meant for.
constexpr int32_t kProbeThreadPriority = -2;

constexpr int kStateBoost = 0;
constexpr int kStateUnboost = -1;

bool isLive(const ProbeHandler::ProbeThread::ProbeQueue& queue, uint32_t tid) {
    const ssize_t index = queue.indexOfKey(tid);
    return index >= 0 && queue.valueAt(index)->timestamp != 0;
}

// Zeroes the entry's timestamp and puts it back under its key; false when there is none.
bool markWithdrawn(ProbeHandler::ProbeThread::ProbeQueue& queue, uint32_t tid) {
    const ssize_t index = queue.indexOfKey(tid);
    if (index < 0) {
        return false;
    }
    const sp<ProbeHandler::ProbeThread::ProbeItem> item = queue.valueAt(index);
    item->timestamp = 0;
    queue.replaceValueFor(tid, item);
    return true;
}

// Traces how many threads the boosted queue holds live. Thread 0 is left out: it is never
// boosted on the platform. Counted afresh rather than kept, so the figure cannot drift from the
// queue; only when tracing, and the queue is small.
void traceBoostedCount(const ProbeHandler::ProbeThread::ProbeQueue& boosted) {
    if (!velmora::Trace::enabled()) {
        return;
    }
    int64_t live = 0;
    for (size_t i = 0; i < boosted.size(); ++i) {
        const ProbeHandler::ProbeThread::ProbeItem& item = *boosted.valueAt(i);
        if (item.timestamp != 0 && item.tid != 0) {
            ++live;
        }
    }
    velmora::Trace::counter(velmora::ServerTrace::kProbeBoostedTrack, live);
}

}  // namespace

ProbeHandler::ProbeThread::ProbeItem::ProbeItem(uint32_t itemTid, int64_t itemTimestamp)
    : tid(itemTid), timestamp(itemTimestamp) {}

ProbeHandler::ProbeThread::ProbeThread(ProbeHandler& handler, VelmoraPlat* plat, Action* action)
    : android::Thread(true),
      mHandler(handler),
      mPlat(plat),
      mAction(action),
      mClock(velmora::ProbeClock::create()) {
    if (mAction != nullptr && mAction->mDuration > kMaxProbeDurationMs) {
        mAction->mDuration = kMaxProbeDurationMs;
    }
}

ProbeHandler::ProbeThread::~ProbeThread() {
    // Runs on whichever thread drops the last reference, possibly the worker itself once its
    // loop has ended. Nobody else can hold mLock by then; taking it keeps deleteAction's
    // contract and gives the sanitizers an ordering with the host's last queue change.
    Mutex::Autolock lock(mLock);
    deleteAction();
    delete mClock;
}

void ProbeHandler::ProbeThread::onFirstRef() {
    const android::status_t ret = run("ProbeThread", kProbeThreadPriority, 0);
    if (ret != android::NO_ERROR) {
        VLOGE("ProbeThread run failed: %d", ret);
    }
}

void ProbeHandler::ProbeThread::addItemToQueue(int pid, uint32_t tid) {
    // A process is treated as boosted while its main thread (tid == pid) has an entry in the
    // boosted queue, even a withdrawn one that the worker has not dropped yet: its other
    // threads then skip the delay.
    if (mBoostedQueue.indexOfKey(static_cast<uint32_t>(pid)) >= 0) {
        handleBoostItem(tid);
        addItemToBoostedQueue(tid);
        return;
    }
    addItemToWaitQueue(tid);
}

void ProbeHandler::ProbeThread::addItemToWaitQueue(uint32_t tid) {
    if (!isLive(mWaitQueue, tid) && !isLive(mBoostedQueue, tid)) {
        mWaitQueue.replaceValueFor(tid, new ProbeItem(tid, mClock->now()));
    }
    mClock->signal(mCond);
}

void ProbeHandler::ProbeThread::addItemToBoostedQueue(uint32_t tid) {
    if (isLive(mWaitQueue, tid)) {
        markWithdrawn(mWaitQueue, tid);
    }
    if (!isLive(mBoostedQueue, tid)) {
        addItemToBoostedQueueLocked(tid);
    }
}

void ProbeHandler::ProbeThread::addItemToBoostedQueueLocked(uint32_t tid) {
    mBoostedQueue.replaceValueFor(tid, new ProbeItem(tid, mClock->now()));
    traceBoostedCount(mBoostedQueue);
}

void ProbeHandler::ProbeThread::moveItemFromWaitQueueToBoosted(uint32_t tid) {
    mWaitQueue.removeItem(tid);
    addItemToBoostedQueueLocked(tid);
}

void ProbeHandler::ProbeThread::moveItemToUnboostQueue(uint32_t tid) {
    markWithdrawn(mWaitQueue, tid);
    if (markWithdrawn(mBoostedQueue, tid)) {
        handleUnboostItem(tid);
        traceBoostedCount(mBoostedQueue);
    }
    mClock->signal(mCond);
}

void ProbeHandler::ProbeThread::handleBoostItem(uint32_t tid) {
    applyProbeState(tid, kStateBoost, "handleBoostItem doAction failed");
}

void ProbeHandler::ProbeThread::handleUnboostItem(uint32_t tid) {
    applyProbeState(tid, kStateUnboost, "handleUnBoostItem doAction failed");
}

void ProbeHandler::ProbeThread::applyProbeState(uint32_t tid, int state, const char* failure) {
    // A platform without an executor simply has no per-thread boost; the queues still move.
    PerfExecutor* executor = mPlat != nullptr ? mPlat->mExecutorPtr : nullptr;
    if (executor == nullptr) {
        return;
    }
    // The platform refuses threads it cannot boost (already gone, not ours); that is routine.
    if (executor->setProbeTid(tid, state) != 0) {
        return;
    }
    const int values[1] = {state};
    // The platform may drop its executor between the two calls.
    executor = mPlat->mExecutorPtr;
    if (executor == nullptr || executor->doAction(mAction, 1, values) != 0) {
        VLOGD("%s", failure);
    }
}

void ProbeHandler::ProbeThread::update(Action* action) {
    Mutex::Autolock lock(mLock);
    deleteAction();
    mAction = action;
}

void ProbeHandler::ProbeThread::deleteAction() {
    velmora::deleteActionChain(mAction);
    mAction = nullptr;
}

void ProbeHandler::ProbeThread::shutdown() {
    // Raise the exit flag before signalling: the worker checks it under mLock right before it
    // would wait, so the signal below cannot be lost.
    requestExit();
    {
        Mutex::Autolock lock(mLock);
        mPlat = nullptr;
        mClock->signal(mCond);
    }
    mClock->wakeForExit();
    // A pass in progress may still read mHandler; waiting keeps the owner alive until it ends.
    requestExitAndWait();
}

bool ProbeHandler::ProbeThread::threadLoop() {
    const int64_t now = mClock->now();
    const int64_t delayMs = mHandler.mBoostDelayMs;
    int64_t sleepMs = 0;

    // The lock is taken per index so that host threads never wait for a whole pass. Only this
    // thread removes entries, and it walks from the end, so an index below the size read here
    // stays valid; host threads may add entries meanwhile and shift later ones, which at worst
    // defers them to the next pass. The size itself is read under the lock too, since host
    // threads add entries at any time.
    size_t count;
    mLock.lock();
    count = mWaitQueue.size();
    mLock.unlock();
    for (size_t i = count; i-- > 0;) {
        mLock.lock();
        if (i < mWaitQueue.size()) {
            const sp<ProbeItem> item = mWaitQueue.valueAt(i);
            const uint32_t tid = item->tid;
            if (item->timestamp == 0) {
                mWaitQueue.removeItemsAt(i);
            } else if (now - item->timestamp >= delayMs * kNsPerMs) {
                moveItemFromWaitQueueToBoosted(tid);
                // Thread id 0 names no user thread (it is the kernel's idle task): it moves
                // through the queues like any other but is never sent to the platform here.
                if (tid != 0) {
                    handleBoostItem(tid);
                }
            } else {
                // Deliberately the last pending item visited (the smallest thread id), not
                // the minimum over all: an item with a larger id that falls due earlier waits
                // for this one and is boosted in the same pass.
                sleepMs = delayMs - (now - item->timestamp) / kNsPerMs;
            }
        }
        mLock.unlock();
    }

    mLock.lock();
    count = mBoostedQueue.size();
    for (size_t i = count; i-- > 0;) {
        if (i < mBoostedQueue.size()) {
            const sp<ProbeItem> item = mBoostedQueue.valueAt(i);
            if (item->timestamp == 0) {
                mBoostedQueue.removeItemsAt(i);
            } else if (now - item->timestamp >= kBoostLifetimeNs) {
                // Only marked here; the entry goes on a later pass like any withdrawal.
                if (item->tid != 0) {
                    moveItemToUnboostQueue(item->tid);
                } else {
                    // Thread 0 was never boosted on the platform, so there is nothing to
                    // withdraw; it still has to expire, or the loop would poll forever.
                    item->timestamp = 0;
                }
            }
        }
        if (i > 0) {
            mLock.unlock();
            mLock.lock();
        }
    }

    if (mWaitQueue.isEmpty() && mBoostedQueue.isEmpty()) {
        if (!exitPending()) {
            mClock->wait(mCond, mLock);
        }
        mLock.unlock();
        return true;
    }
    mLock.unlock();
    // With only boosted items left sleepMs is 0 and the loop polls until they expire or are
    // withdrawn: CPU time traded for a lifetime that ends on time without a timed wait.
    mClock->sleepMs(sleepMs);
    return true;
}
