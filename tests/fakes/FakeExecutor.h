// Test executor: records every call with its arguments and answers with scripted results.
#pragma once

#include <chrono>
#include <condition_variable>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "platform/PerfExecutor.h"

namespace velmora {
namespace fake {

enum class Op { DoAction, SetConfig, GetConfig, SchedLevel, ProbeTid };

struct ExecutorCall {
    explicit ExecutorCall(Op o) : op(o) {}
    Op op;
    int id = 0;  // doAction: the action's cmdId; doPerfSetConfig: the client or command id
    int duration = 0;
    std::string name;
    std::vector<int> tagValues;        // doAction: the action's integer pairs, flat
    std::vector<std::string> params;   // doAction: the action's string pairs, flat
    std::vector<int> payload;          // doAction
    std::vector<int> tags;             // set/get config; sched level: groups
    std::vector<int> values;           // set config values; sched level: levels
    unsigned int tid = 0;              // setProbeTid
    int state = 0;                     // setProbeTid
    std::chrono::steady_clock::time_point when;
};

class FakeExecutor : public PerfExecutor {
public:
    int doAction(const Action* action, unsigned int payloadNum, const int* payload) override;
    int doPerfSetConfig(int id, int count, const int* tags, const int* values) override;
    int doPerfGetConfig(int count, const int* tags, int* values) override;
    int doSchedLevelAction(int count, const int* groups, const int* levels) override;
    int setProbeTid(unsigned int tid, int state) override;

    // Result returned by every later call of `op` (0 by default).
    void setResult(Op op, int result);
    // Value doPerfGetConfig reports for `tag`; unknown tags keep what the caller preset.
    void setConfigValue(int tag, int value);
    // Called inside doAction before it records (to inject delays in race tests).
    void setActionHook(std::function<void(const Action*)> hook);

    std::vector<ExecutorCall> calls() const;
    std::vector<ExecutorCall> calls(Op op) const;
    void clear();
    void reset();
    // Waits until at least `count` calls of `op` were recorded.
    bool waitFor(Op op, size_t count, std::chrono::milliseconds timeout) const;

private:
    int record(ExecutorCall call);
    // Records `call` with the first `count` entries of both arrays as its tags and values.
    int recordArrays(ExecutorCall call, int count, const int* tags, const int* values);

    mutable std::mutex mLock;  // guards everything below
    mutable std::condition_variable mCond;
    std::vector<ExecutorCall> mCalls;
    std::map<Op, int> mResults;
    std::map<int, int> mConfigValues;
    std::function<void(const Action*)> mActionHook;
};

}  // namespace fake
}  // namespace velmora
