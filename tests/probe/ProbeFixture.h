// Fixture for the probe handler and its worker, run against a bare platform object whose
// executor records every call, on a virtual clock (advance() moves it). The handler is declared
// last so that it (and with it the worker) goes before the platform and the executor it uses.
#pragma once

#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "config/Action.h"
#include "platform/VelmoraPlat.h"
#include "probe/ProbeHandler.h"
#include "probe/ProbeThread.h"
#include "tests/fakes/FakeExecutor.h"
#include "tests/fakes/FakeProbeClock.h"
#include "tests/fakes/LogCapture.h"

namespace velmora {
namespace fake {

constexpr int kBoostDelayMs = 8;
constexpr int kBoostLifetimeMs = 256;

using ProbeThread = ProbeHandler::ProbeThread;

// The probe command as the server parses it: cmdId 4116, "probe", one integer pair.
inline Action* makeProbeAction(int duration, int value = 1000) {
    Action* action = new Action();
    action->mCmdId = 4116;
    action->mName = "probe";
    action->mDuration = duration;
    action->mParamNum = 1;
    action->mTagValues = {1, value};
    return action;
}

// setProbeTid(tid, state) as recorded, for comparing whole sequences.
using TidCall = std::pair<unsigned int, int>;

class ProbeFixture : public ::testing::Test {
protected:
    void SetUp() override {
        LogCapture::start();
        mPlat.mExecutorPtr = &mExecutor;
        FakeProbeClock::install();
    }
    void TearDown() override {
        mHandler.reset();
        FakeProbeClock::uninstall();
    }

    void startHandler(Action* action = makeProbeAction(8)) {
        mHandler = std::make_unique<ProbeHandler>(&mPlat, action);
    }
    ProbeThread& thread() { return *mHandler->mProbeThreadPtr; }
    // Moves the worker's time on by `ms`; returns once it has made the passes due on the way.
    void advance(int ms) { FakeProbeClock::last().advance(ms); }

    int probe(int pid, int tid, int state) {
        const std::string msg = "pid=" + std::to_string(pid) + "|tid=" + std::to_string(tid);
        return mHandler->handle(msg.c_str(), 1, &state);
    }

    std::vector<TidCall> tidCalls() const {
        std::vector<TidCall> out;
        for (const auto& call : mExecutor.calls(Op::ProbeTid)) {
            out.push_back({call.tid, call.state});
        }
        return out;
    }
    // Queue views, read under the worker's lock. -1: no entry; 0: withdrawn.
    int64_t waitTimestamp(uint32_t tid) { return timestampIn(&ProbeThread::mWaitQueue, tid); }
    int64_t boostedTimestamp(uint32_t tid) { return timestampIn(&ProbeThread::mBoostedQueue, tid); }
    // The same with the worker's lock already held by the caller; the analysis cannot follow
    // the lock through thread(), hence the opt-out.
    int64_t waitTimestampLocked(uint32_t tid) NO_THREAD_SAFETY_ANALYSIS {
        return timestampOf(thread().mWaitQueue, tid);
    }
    int64_t boostedTimestampLocked(uint32_t tid) NO_THREAD_SAFETY_ANALYSIS {
        return timestampOf(thread().mBoostedQueue, tid);
    }
    size_t queuedCount() {
        ProbeThread& t = thread();
        android::Mutex::Autolock lock(t.mLock);
        return t.mWaitQueue.size() + t.mBoostedQueue.size();
    }

    FakeExecutor mExecutor;
    VelmoraPlat mPlat;
    std::unique_ptr<ProbeHandler> mHandler;

private:
    static int64_t timestampOf(const ProbeThread::ProbeQueue& queue, uint32_t tid) {
        const ssize_t index = queue.indexOfKey(tid);
        return index < 0 ? -1 : queue.valueAt(index)->timestamp;
    }
    int64_t timestampIn(ProbeThread::ProbeQueue ProbeThread::*queue, uint32_t tid) {
        ProbeThread& t = thread();
        android::Mutex::Autolock lock(t.mLock);
        return timestampOf(t.*queue, tid);
    }
};

}  // namespace fake
}  // namespace velmora
