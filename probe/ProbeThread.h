// The probe worker: boosts a queued thread once it has waited mBoostDelayMs (8 ms), so that
// short bursts never reach the hardware, and withdraws the boost on request or after
// kProbeBoostLifetimeMs (config/CommandIds.h).
//
// Owns the probe action chain (mAction) and two queues keyed by thread id: mWaitQueue (asked
// for a boost) and mBoostedQueue (holding one). A withdrawn entry is not moved anywhere: its
// timestamp becomes 0 and the worker drops it on its next pass. Applying or withdrawing a
// boost is setProbeTid(tid, 0 / -1) followed by doAction(mAction, 1, {0 / -1}) on the
// platform's executor, read afresh at every use because the platform may not have one.
//
// Callers: ProbeHandler::handle and updateProbeThread on host threads, and threadLoop on the
// worker itself. One mutex, mLock, guards both queues, every item's timestamp, mAction and
// mPlat. The queue operations below expect mLock held (REQUIRES); only update() and
// shutdown() lock it themselves. The worker takes mLock per queue index, so host calls
// interleave with a pass; platform calls are made with mLock held.
//
// mCond is signalled whenever an item is queued or withdrawn; the worker waits on it only while
// both queues are empty. It runs on CLOCK_MONOTONIC like every timestamp here: boosts are timed
// in milliseconds, and a wall-clock step (network time arriving after boot) must neither fire
// nor stall them. Timestamps, the sleep between passes and the wait on mCond all go through
// mClock (ProbeClock.h), the system's own calls unless a platform layer installed a clock.
//
// Lifetime: the first strong reference starts the thread. libutils' loop promotes a strong
// reference to this object around every threadLoop call, so the object outlives any pass in
// progress even when its owner lets go. mHandler and mPlat belong to others, though, which is
// why the owner calls shutdown() before either goes away.
#pragma once

#include <stdint.h>
#include <utils/Condition.h>
#include <utils/KeyedVector.h>
#include <utils/Mutex.h>
#include <utils/RefBase.h>
#include <utils/StrongPointer.h>
#include <utils/Thread.h>

#include "probe/ProbeClock.h"
#include "probe/ProbeHandler.h"

class Action;
class VelmoraPlat;

class ProbeHandler::ProbeThread : public android::Thread {
public:
    // One queued thread. Shared by strong pointers between a queue and the pass that looks
    // at it; `timestamp` changes only under the owning worker's mLock.
    class ProbeItem : public android::RefBase {
    public:
        ProbeItem(uint32_t tid, int64_t timestamp);

        uint32_t tid;
        // systemTime(SYSTEM_TIME_MONOTONIC) when queued, in ns; 0 means withdrawn.
        int64_t timestamp;
    };
    using ProbeQueue = android::KeyedVector<uint32_t, android::sp<ProbeItem>>;

    // Takes ownership of the `action` chain and caps its duration at kProbeDurationCapMs.
    // `handler` supplies the boost delay and must outlive the worker's passes (see shutdown).
    ProbeThread(ProbeHandler& handler, VelmoraPlat* plat, Action* action);
    ~ProbeThread() override;

    // Entry for a state-0 event: boosts `tid` at once when its process `pid` is in the boosted
    // queue, otherwise queues it for a delayed boost.
    void addItemToQueue(int pid, uint32_t tid) REQUIRES(mLock);
    // Queues `tid` unless it is live in either queue (a repeated request keeps its timer).
    void addItemToWaitQueue(uint32_t tid) REQUIRES(mLock);
    // Withdraws a live wait entry of `tid` and adds a boosted entry unless a live one exists.
    void addItemToBoostedQueue(uint32_t tid) REQUIRES(mLock);
    // Adds a fresh boosted entry for `tid`, replacing any entry with that key.
    void addItemToBoostedQueueLocked(uint32_t tid) REQUIRES(mLock);
    void moveItemFromWaitQueueToBoosted(uint32_t tid) REQUIRES(mLock);
    // Marks `tid` withdrawn in both queues and withdraws its boost if it had one.
    void moveItemToUnboostQueue(uint32_t tid) REQUIRES(mLock);
    void handleBoostItem(uint32_t tid) REQUIRES(mLock);
    void handleUnboostItem(uint32_t tid) REQUIRES(mLock);
    // Replaces the action chain (taken over as is, not capped).
    void update(Action* action) EXCLUDES(mLock);
    void deleteAction() REQUIRES(mLock);
    // Stops the worker for good and waits until it has left threadLoop; from then on no
    // platform call is made by anyone through this object. Not from the worker thread itself.
    void shutdown() EXCLUDES(mLock);

    android::Mutex mLock;
    ProbeHandler& mHandler;
    android::Condition mCond;
    // Guarded by mLock.
    ProbeQueue mWaitQueue GUARDED_BY(mLock);
    ProbeQueue mBoostedQueue GUARDED_BY(mLock);
    VelmoraPlat* mPlat GUARDED_BY(mLock);  // not owned; null once shut down
    Action* mAction GUARDED_BY(mLock);
    // Where every timestamp, sleep and wait of this worker goes; owned, set for its lifetime.
    velmora::ProbeClock* const mClock;

private:
    bool threadLoop() override;
    void onFirstRef() override;

    // setProbeTid(tid, state), then doAction(mAction, 1, {state}) when that succeeded.
    void applyProbeState(uint32_t tid, int state, const char* failure) REQUIRES(mLock);
};
