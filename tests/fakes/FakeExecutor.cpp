#include "tests/fakes/FakeExecutor.h"

#include <algorithm>
#include <iterator>

#include "config/Action.h"

namespace velmora {
namespace fake {

int FakeExecutor::record(ExecutorCall call) {
    call.when = std::chrono::steady_clock::now();
    std::lock_guard<std::mutex> lock(mLock);
    const Op op = call.op;
    mCalls.push_back(std::move(call));
    mCond.notify_all();
    auto it = mResults.find(op);
    return it == mResults.end() ? 0 : it->second;
}

int FakeExecutor::doAction(const Action* action, unsigned int payloadNum, const int* payload) {
    std::function<void(const Action*)> hook;
    {
        std::lock_guard<std::mutex> lock(mLock);
        hook = mActionHook;
    }
    if (hook) {
        hook(action);
    }
    ExecutorCall call(Op::DoAction);
    if (action != nullptr) {
        call.id = action->mCmdId;
        call.duration = action->mDuration;
        call.name = action->mName;
        call.tagValues = action->mTagValues;
        call.params = action->mParams;
    }
    if (payload != nullptr) {
        call.payload.assign(payload, payload + payloadNum);
    }
    return record(std::move(call));
}

int FakeExecutor::recordArrays(ExecutorCall call, int count, const int* tags, const int* values) {
    if (count > 0) {
        call.tags.assign(tags, tags + count);
        call.values.assign(values, values + count);
    }
    return record(std::move(call));
}

int FakeExecutor::doPerfSetConfig(int id, int count, const int* tags, const int* values) {
    ExecutorCall call(Op::SetConfig);
    call.id = id;
    return recordArrays(std::move(call), count, tags, values);
}

int FakeExecutor::doPerfGetConfig(int count, const int* tags, int* values) {
    {
        std::lock_guard<std::mutex> lock(mLock);
        for (int i = 0; i < count; ++i) {
            auto it = mConfigValues.find(tags[i]);
            if (it != mConfigValues.end()) {
                values[i] = it->second;
            }
        }
    }
    return recordArrays(ExecutorCall(Op::GetConfig), count, tags, values);
}

int FakeExecutor::doSchedLevelAction(int count, const int* groups, const int* levels) {
    return recordArrays(ExecutorCall(Op::SchedLevel), count, groups, levels);
}

int FakeExecutor::setProbeTid(unsigned int tid, int state) {
    ExecutorCall call(Op::ProbeTid);
    call.tid = tid;
    call.state = state;
    return record(std::move(call));
}

void FakeExecutor::setResult(Op op, int result) {
    std::lock_guard<std::mutex> lock(mLock);
    mResults[op] = result;
}

void FakeExecutor::setConfigValue(int tag, int value) {
    std::lock_guard<std::mutex> lock(mLock);
    mConfigValues[tag] = value;
}

void FakeExecutor::setActionHook(std::function<void(const Action*)> hook) {
    std::lock_guard<std::mutex> lock(mLock);
    mActionHook = std::move(hook);
}

std::vector<ExecutorCall> FakeExecutor::calls() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mCalls;
}

std::vector<ExecutorCall> FakeExecutor::calls(Op op) const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<ExecutorCall> out;
    std::copy_if(mCalls.begin(), mCalls.end(), std::back_inserter(out),
                 [op](const ExecutorCall& call) { return call.op == op; });
    return out;
}

void FakeExecutor::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mCalls.clear();
}

void FakeExecutor::reset() {
    std::lock_guard<std::mutex> lock(mLock);
    mCalls.clear();
    mResults.clear();
    mConfigValues.clear();
    mActionHook = nullptr;
}

bool FakeExecutor::waitFor(Op op, size_t count, std::chrono::milliseconds timeout) const {
    std::unique_lock<std::mutex> lock(mLock);
    return mCond.wait_for(lock, timeout, [&] {
        size_t n = 0;
        for (const auto& call : mCalls) {
            n += call.op == op ? 1 : 0;
        }
        return n >= count;
    });
}

}  // namespace fake
}  // namespace velmora
