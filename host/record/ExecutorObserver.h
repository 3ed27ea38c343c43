// What the host executor tells an observer about the requests it carries out, so that a tool
// can say who holds each node's value and what stayed applied. Optional: without an observer
// the executor does exactly the same work.
//
// The executor calls every function with its own lock held, from the thread of the request
// (host calls, the timed-action expiry, the probe worker). An observer must be thread safe, must
// not call back into the executor, and should be quick: it sits on the node-write path.
#pragma once

#include <string>

namespace velmora {

class ExecutorObserver {
public:
    virtual ~ExecutorObserver() = default;

    // A command's action was applied (or re-armed). `category` is "scene", "onoff", "memlat" or
    // "action"; `durationMs` is positive for timed actions, 0 otherwise.
    virtual void onCommandApplied(int cmdId, const std::string& category, const std::string& name,
                                  int durationMs) = 0;
    // A command's action was withdrawn: by payload -1, or by its timer when `expired`.
    virtual void onCommandWithdrawn(int cmdId, bool expired) = 0;
    // A thread gained (`boosted`) or lost its probe boost.
    virtual void onProbeBoost(unsigned int tid, bool boosted) = 0;
    // Merged frequency configuration from the server: `id` is the client id (0..3) or the
    // command id of an on/off command; a value of 0 or below releases the node.
    virtual void onFreqConfig(int id, const std::string& key, int value) = 0;
    // The node's requests were combined: `value` is in force, held by `source` (the resolver's
    // source name: "freq", "sched", "probe", "cmd:<id>"), "" when no request beats the node's
    // initial value. Called on every resolution, also when the value did not change.
    virtual void onNodeResolved(const std::string& key, const std::string& value,
                                const std::string& source) = 0;
};

}  // namespace velmora
