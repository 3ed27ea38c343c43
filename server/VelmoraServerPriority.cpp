// Special-scene priorities: built-in and configured values and the selection of the scene to
// apply. Lookups in mPriorityMap insert a 0 entry on a miss, on purpose: a scene without a
// configured priority is remembered as invalid.
#include <cstdlib>
#include <cstring>

#include "config/Action.h"
#include "config/CommandIds.h"
#include "config/CommandKind.h"
#include "config/Tags.h"
#include "config/VelmoraParser.h"
#include "platform/VelmoraPlat.h"
#include "server/VelmoraServer.h"

using namespace velmora;

namespace {

constexpr int kPriorityTag = kTagScenePriority;
constexpr const char* kPriorityKey = kScenePriorityKey;
constexpr int kPriorityMin = kScenePriorityMin;
constexpr int kPriorityMax = kScenePriorityMax;

bool isGovScene(int cmdId) {
    return isGovernorSceneId(cmdId);
}

bool inPriorityRange(int prio) {
    return prio >= kPriorityMin && prio <= kPriorityMax;
}

}  // namespace

void VelmoraServer::initExistingPriority() {
    for (const auto& scene : kBuiltInScenePriorities) {
        mPriorityMap[scene.cmdId] = scene.priority;
    }
}

int VelmoraServer::getPriority(Action* action) {
    if (action == nullptr || action->mParamNum < 1) {
        return 0;
    }
    int prio = 0;
    const size_t pairs = static_cast<size_t>(action->mParamNum);
    for (size_t i = 0; i < pairs && 2 * i + 1 < action->mTagValues.size(); ++i) {
        if (action->mTagValues[2 * i] == kPriorityTag) {
            prio = action->mTagValues[2 * i + 1];
        }
    }
    return prio;
}

int VelmoraServer::getInterPriority(Action* action) {
    if (action == nullptr || action->mParamNum < 1) {
        return 0;
    }
    int prio = 0;
    const size_t pairs = static_cast<size_t>(action->mParamNum);
    for (size_t i = 0; i < pairs && 2 * i + 1 < action->mParams.size(); ++i) {
        if (action->mParams[2 * i] == kPriorityKey) {
            prio = atoi(action->mParams[2 * i + 1].c_str());
        }
    }
    return prio;
}

void VelmoraServer::setPriorityMap(int cmdId, Action* action) {
    if (action == nullptr || action->mParamNum < 1) {
        return;
    }
    const int prio = isGovScene(cmdId) ? getInterPriority(action) : getPriority(action);
    if (!inPriorityRange(prio)) {
        return;  // an invalid configured value keeps the built-in or earlier entry
    }
    mPriorityMap[cmdId] = prio;
}

void VelmoraServer::initPriorityMap() {
    for (int cmdId = kSpecialSceneFirst; cmdId <= kScenePriorityReadLast; ++cmdId) {
        Action action;
        if (parseCommand(cmdId, &action) == 0) {
            setPriorityMap(cmdId, &action);
        }
    }
}

void VelmoraServer::updatePriorityMap() {
    VelmoraParser* parser = mPlatPtr != nullptr ? mPlatPtr->mParserPtr : nullptr;
    android::Mutex::Autolock lock(mMutex);
    mPriorityMap.clear();
    initExistingPriority();
    if (parser == nullptr) {
        return;
    }
    // The parser's write lock is held by the reload that called us.
    for (int cmdId = kSpecialSceneFirst; cmdId <= kScenePriorityReadLast; ++cmdId) {
        Action action;
        if (parser->doParseLocked(cmdId, &action) == 0) {
            setPriorityMap(cmdId, &action);
        }
    }
}

bool VelmoraServer::isPriorityValid(int cmdId) {
    return inPriorityRange(mPriorityMap[cmdId]);
}

int VelmoraServer::doOnEvent(int cmdId, int newPrio, int curPrio) {
    mOnEventSet.insert(cmdId);
    if (newPrio <= curPrio) {
        return 1;
    }
    return mCurSpecialCmdId != 0 ? 3 : 0;
}

int VelmoraServer::doOffEvent(int cmdId, int* nextCmdId, int* flag) {
    mOnEventSet.erase(cmdId);
    if (cmdId != mCurSpecialCmdId) {
        return 2;
    }
    const int next = getCmdIdWithMaxPrio(false);
    if (next != 0) {
        *nextCmdId = next;
        *flag = 0;
        mCurSpecialCmdId = next;
        return 3;
    }
    *nextCmdId = cmdId;
    mCurSpecialCmdId = 0;
    return 0;
}

int VelmoraServer::getCmdIdWithMaxPrio(bool govOnly) {
    int best = 0;
    int bestPrio = -1;
    for (int cmdId : mOnEventSet) {
        if (govOnly && cmdId < kGovSceneFirst) {
            continue;
        }
        const int prio = mPriorityMap[cmdId];
        if (prio > bestPrio) {  // strict: ties go to the smaller cmdId
            best = cmdId;
            bestPrio = prio;
        }
    }
    return best;
}

int VelmoraServer::getMaxGovPrioCmdIdInOnEvent(int cmdId) {
    if (!isGovScene(cmdId) || mCurSpecialCmdId != kGovHostScene) {
        return 0;
    }
    const int best = getCmdIdWithMaxPrio(true);
    // A tie goes to the scene that just switched on.
    return mPriorityMap[cmdId] < mPriorityMap[best] ? best : cmdId;
}

int VelmoraServer::getMaxGovPrioCmdIdInOffEvent() {
    if (mCurSpecialCmdId != kGovHostScene) {
        return 0;
    }
    return getCmdIdWithMaxPrio(true);
}
