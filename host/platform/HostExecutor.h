// The host platform's executor: carries out actions, frequency configurations, group levels and
// probe boosts on the device nodes.
//
// - Timed actions (ordinary commands with a positive duration) are applied at once and reverted
//   when their duration expires; the same command again re-arms the timer; payload -1 withdraws
//   the action early.
// - Special scenes (4118..4352), on/off commands (12288..13568) and memory latency (20480,
//   20481) are applied with payload 0 and withdrawn with payload -1; no timer.
// - The probe command (4116) applies to the thread chosen by setProbeTid; its parameters stay
//   applied while at least one thread is boosted.
// - doPerfSetConfig values are the merged configuration: the latest value of a tag wins, 0
//   (or -1) releases the tag. doSchedLevelAction levels are written to the group nodes; -100
//   ("no level") releases the group.
//
// Every request is a source in the NodeResolver, so a floor set by a boost and one set by a
// client combine, and withdrawing one leaves the other in force.
// Thread safe: mLock serialises all operations. Lock order: mLock before the scheduler's lock.
#pragma once

#include <mutex>
#include <set>
#include <string>

#include "host/device/DeviceTree.h"
#include "host/record/ExecutorObserver.h"
#include "host/time/HostClock.h"
#include "host/device/NodeMap.h"
#include "host/device/NodeResolver.h"
#include "host/time/TimedActionScheduler.h"
#include "host/record/Timeline.h"
#include "platform/PerfExecutor.h"

namespace velmora {

class HostExecutor : public PerfExecutor {
public:
    HostExecutor(const NodeMap& nodes, DeviceTree& tree, HostClock& clock, Timeline& timeline);
    ~HostExecutor() override;

    // 0 applied or withdrawn, -1 null action or a node write failed.
    int doAction(const Action* action, unsigned int payloadNum, const int* payload) override;
    // 0, or -1 when a tag has no node or a write failed (the other tags are still applied).
    int doPerfSetConfig(int id, int count, const int* tags, const int* values) override;
    // Current node values of `tags`; 0, or -1 when one has no readable node (left unchanged).
    int doPerfGetConfig(int count, const int* tags, int* values) override;
    // 0, or -1 when a group tag has no node or a write failed.
    int doSchedLevelAction(int count, const int* groups, const int* levels) override;
    // Remembers the thread for the next probe action. Always 0.
    int setProbeTid(unsigned int tid, int state) override;

    // Whether a timed action of `cmdId` is waiting to expire.
    bool timedActionPending(int cmdId) const;
    // Number of threads holding a probe boost.
    size_t boostedThreads() const;
    // Tells `observer` (null: nobody) about every request from now on; it must outlive the
    // executor or be unset first.
    void setObserver(ExecutorObserver* observer);

private:
    // The node requests an action makes; logs pairs without a node. REQUIRES: mLock held.
    NodeResolver::Requests requestsOf(const Action& action);
    void onExpire(int cmdId);
    int doProbeAction(const Action& action, bool withdraw);  // REQUIRES: mLock held

    const NodeMap& mNodes;
    DeviceTree& mTree;
    Timeline& mTimeline;
    mutable std::mutex mLock;  // guards everything below, and the node writes
    NodeResolver mResolver;
    unsigned int mProbeTid = 0;
    std::set<unsigned int> mBoosted;
    std::set<int> mApplied;  // commands whose action is applied
    ExecutorObserver* mObserver = nullptr;
    // Last: its worker calls onExpire, which needs every member above.
    TimedActionScheduler mTimers;
};

}  // namespace velmora
