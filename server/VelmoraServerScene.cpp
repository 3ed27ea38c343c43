// Special scenes: several may be on, the one with the highest priority is applied. The scene
// state changes under mMutex; the platform is called only after it has been released, so two
// concurrent switches may reach the platform in either order. State is not rolled back when
// the platform fails. The applied scene is traced while mMutex is still held, so that the trace
// track follows the state in the order it changed (a trace point takes no lock of its own).
#include "config/Action.h"
#include "config/CommandIds.h"
#include "platform/PerfExecutor.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "server/VelmoraServer.h"
#include "trace/ServerTrace.h"

using namespace velmora;

namespace {

constexpr int kApply = 0;
constexpr int kWithdraw = -1;

}  // namespace

int VelmoraServer::doSpecialSceneEvent(int cmdId, unsigned int payloadNum, const int* payload) {
    if (cmdId == kCmdClientRestart) {
        int previous = 0;
        {
            android::Mutex::Autolock lock(mMutex);
            if (mCurSpecialCmdId == 0) {
                return 0;
            }
            VLOGI("client may rebooted, clean special scene set, cmdId is %d", cmdId);
            mOnEventSet.clear();
            previous = mCurSpecialCmdId;
            mCurSpecialCmdId = 0;
            ServerTrace::scene(0);
        }
        return doSpecialAction(previous, kWithdraw);
    }

    if (!isParamValid(payloadNum, payload)) {
        VLOGE("invalid special scene parameters, cmdId is %d", cmdId);
        return -1;
    }

    mMutex.lock();
    if (!isPriorityValid(cmdId)) {
        VLOGE("invalid special scene priority, cmdId is %d", cmdId);
        mMutex.unlock();
        return -1;
    }
    const int newPrio = mPriorityMap[cmdId];
    const int curPrio = mPriorityMap[mCurSpecialCmdId];

    if (payload[0] == 0) {
        mOnEventSet.insert(cmdId);
        if (newPrio <= curPrio) {
            const int gov = getMaxGovPrioCmdIdInOnEvent(cmdId);
            mMutex.unlock();
            return gov == 0 ? 0 : doSpecialAction(gov, kApply);
        }
        const int previous = mCurSpecialCmdId;
        mCurSpecialCmdId = cmdId;
        ServerTrace::scene(cmdId);
        mMutex.unlock();
        if (previous == 0) {
            return doSpecialAction(cmdId, kApply);
        }
        const int withdrawRet = doSpecialAction(previous, kWithdraw);
        return withdrawRet | doSpecialAction(cmdId, kApply);
    }

    mOnEventSet.erase(cmdId);
    if (cmdId != mCurSpecialCmdId) {
        if (mCurSpecialCmdId == kGovHostScene) {
            const int gov = getCmdIdWithMaxPrio(true);
            mMutex.unlock();
            return gov == 0 ? 0 : doSpecialAction(gov, kApply);
        }
        mMutex.unlock();
        return 0;
    }
    const int next = getCmdIdWithMaxPrio(false);
    mCurSpecialCmdId = next;
    ServerTrace::scene(next);
    mMutex.unlock();
    if (next == 0) {
        return doSpecialAction(cmdId, kWithdraw);
    }
    const int withdrawRet = doSpecialAction(cmdId, kWithdraw);
    return withdrawRet | doSpecialAction(next, kApply);
}

int VelmoraServer::doSpecialAction(int cmdId, int value) {
    if (mDebugLog.load(std::memory_order_relaxed)) {
        VLOGI("doSpecialAction cmdId is %d, payload is %d", cmdId, value);
    }
    Action action;
    const int parseRet = parseCommand(cmdId, &action);
    if (parseRet != 0) {
        VLOGE("velmoraEvent doParse failed! cmdId=%d, errno=%d", cmdId, parseRet);
        return 2;
    }
    PerfExecutor* executor = mPlatPtr != nullptr ? mPlatPtr->mExecutorPtr : nullptr;
    if (executor == nullptr) {
        VLOGE("velmoraEvent doAction failed! cmdId=%d", cmdId);
        return -1;
    }
    const int ret = executor->doAction(&action, 1, &value);
    if (ret != 0) {
        VLOGE("velmoraEvent doAction failed! cmdId=%d", cmdId);
    }
    return ret;
}
