// Event dispatch: velmoraEvent and the paths it takes inline.
#include "config/Action.h"
#include "config/CommandIds.h"
#include "config/CommandKind.h"
#include "config/VelmoraParser.h"
#include "freq/FreqClientManager.h"
#include "freq/FreqTags.h"
#include "platform/OnDemandBoostServer.h"
#include "platform/PerfExecutor.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "probe/ProbeHandler.h"
#include "sched/SchedLevelManager.h"
#include "server/VelmoraServer.h"
#include "trace/TraceSlice.h"

using namespace velmora;

namespace {

// Notification word: bit 18 lets launch policies replace action durations.
constexpr int kPolicyEnableBit = 0x40000;
// On/off pairs with this tag are carried out by the platform, not the frequency manager.
constexpr int kPlatformOnOffTag = kTagDdrMinFreq;
// Most frequency pairs an on/off command may hand to the frequency manager.
constexpr int kMaxOnOffFreqPairs = MAX_EVENT_TAGS;

}  // namespace

int VelmoraServer::isVelmoraEnable(int cmdId, const int* payload) {
    if (!mInitialized) {
        return 1;
    }
    if (mDebugLog.load(std::memory_order_relaxed)) {
        if (payload != nullptr) {
            VLOGI("velmoraEvent cmdId=%d, payload=%d", cmdId, payload[0]);
        } else {
            VLOGI("velmoraEvent cmdId=%d", cmdId);
        }
    }
    if (mPlatPtr == nullptr) {
        VLOGE("isVelmoraEnable mPlatPtr failed!");
        return 4;
    }
    return 0;
}

bool VelmoraServer::isParamValid(unsigned int payloadNum, const int* payload) {
    return payloadNum == 1 && payload != nullptr && (payload[0] == 0 || payload[0] == -1);
}

void VelmoraServer::updatePolicy(int cmdId, Action* action, const int* payload) {
    if (payload == nullptr || !mPolicyEnabled.load(std::memory_order_relaxed) || payload[0] != 0) {
        return;
    }
    if (cmdId != kCmdColdStart && cmdId != kCmdWinSwitch) {
        return;
    }
    const char* name = cmdId == kCmdColdStart ? kColdPolicyName : kWinSwitchPolicyName;
    const int duration = OnDemandBoostServer::getInstance()->getPolicy(name);
    if (duration != -1) {
        action->mDuration = duration;
    }
}

int VelmoraServer::doProbeEvent(const char* msg, unsigned int payloadNum, const int* payload) {
    if (mProbeHandler == nullptr) {
        VLOGE("init mProbeHandler failed!");
        return 4;
    }
    const int ret = mProbeHandler->handle(msg, payloadNum, payload);
    if (ret != 0) {
        VLOGE("velmoraEvent do probe handle failed!");
    }
    return ret;
}

int VelmoraServer::doNotificationEvent(int cmdId, unsigned int payloadNum, const int* payload) {
    if (cmdId == kCmdReload) {
        VelmoraParser* parser = mPlatPtr->mParserPtr;
        if (parser == nullptr) {
            VLOGE("failed to update parser: mParserPtr is NULL!");
            return -1;
        }
        // The slice is opened here, not in the parser: the configuration layer stays below
        // the trace layer.
        const TraceSlice reloadSlice("reload");
        parser->updateParser();
        return 0;
    }
    if (cmdId == kCmdNotification) {
        if (payloadNum != 1 || payload == nullptr) {
            return 0;
        }
        mPolicyEnabled.store((payload[0] & kPolicyEnableBit) != 0, std::memory_order_relaxed);
        const int tag = VELMORA_TAG_FEATURE_SWITCH;
        return velmoraSetConfig(0, 1, &tag, payload);
    }
    if (cmdId == kCmdClientRestart) {
        return doSpecialSceneEvent(kCmdClientRestart, payloadNum, payload);
    }
    return 0;
}

int VelmoraServer::velmoraEvent(int cmdId, const char* msg, unsigned int payloadNum,
                                const int* payload) {
    const TraceSlice slice("velmoraEvent", "cmdId", cmdId);
    const int enable = isVelmoraEnable(cmdId, payload);
    if (enable != 0) {
        return enable;
    }
    const CommandKind kind = classify(cmdId);
    if (kind == CommandKind::kMemoryLatency) {
        return doMemlatencyEvent(cmdId, msg, payloadNum, payload);
    }
    if (kind == CommandKind::kProbe) {
        return doProbeEvent(msg, payloadNum, payload);
    }
    if (cmdId >= kCmdClientRestart) {
        return doNotificationEvent(cmdId, payloadNum, payload);
    }

    Action action;
    const int parseRet = parseCommand(cmdId, &action);
    if (parseRet != 0) {
        VLOGE("velmoraEvent doParse failed! cmdId=%d, errno=%d", cmdId, parseRet);
        return 2;
    }
    updatePolicy(cmdId, &action, payload);

    if (action.mDuration < 0) {
        return 0;
    }
    if (kind == CommandKind::kSpecialScene || kind == CommandKind::kGovernorScene) {
        return doSpecialSceneEvent(cmdId, payloadNum, payload);
    }
    if (kind == CommandKind::kOnOff) {
        return doOnOffAction(&action, payloadNum, payload);
    }
    if (action.mDuration == 0) {
        if (mSchedLevelPtr == nullptr) {
            VLOGE("init mSchedLevelPtr failed!");
            return 4;
        }
        if (mSchedLevelPtr->doEventSchedLevel(&action) == 0) {
            return 0;
        }
    } else {
        PerfExecutor* executor = mPlatPtr->mExecutorPtr;
        if (executor != nullptr && executor->doAction(&action, payloadNum, payload) == 0) {
            return 0;
        }
    }
    VLOGE("velmoraEvent doAction failed! cmdId=%d", cmdId);
    return 3;
}

int VelmoraServer::doOnOffAction(const Action* action, unsigned int payloadNum,
                                 const int* payload) {
    if (action == nullptr) {
        VLOGE("doAction failed, action is NULL!");
        return 4;
    }
    if (!isParamValid(payloadNum, payload)) {
        // The text names special scenes although this is an on/off action; tools match on it.
        VLOGE("invalid special scene parameters, cmdId is %d", action->mCmdId);
        return -1;
    }
    // The executor is read at each use: the platform may install or replace it at any time,
    // also while the frequency manager's call below is under way.
    if (action->mDuration > 0) {
        PerfExecutor* executor = mPlatPtr->mExecutorPtr;
        return executor != nullptr ? executor->doAction(action, 1, payload) : -1;
    }

    int tags[kMaxOnOffFreqPairs] = {0};
    int values[kMaxOnOffFreqPairs] = {0};
    int count = 0;
    const size_t pairs = action->mParamNum > 0 ? static_cast<size_t>(action->mParamNum) : 0;
    for (size_t i = 0; i < pairs && 2 * i + 1 < action->mTagValues.size(); ++i) {
        const int tag = action->mTagValues[2 * i];
        const int value = action->mTagValues[2 * i + 1];
        if (value < 1) {
            VLOGE("invalid parameters, cmdId is %d", action->mCmdId);
            return -1;
        }
        if (tag == kPlatformOnOffTag) {
            continue;
        }
        if (count == kMaxOnOffFreqPairs) {
            VLOGE("on/off command %d has more than %d frequency pairs, rejected", action->mCmdId,
                  kMaxOnOffFreqPairs);
            return -1;
        }
        tags[count] = tag;
        values[count] = value;
        ++count;
    }

    int freqRet = 0;
    if (count > 0) {
        if (mFreqClientPtr == nullptr) {
            VLOGE("init mFreqClientPtr failed!");
            return 4;
        }
        freqRet = mFreqClientPtr->doPerfSetConfig(action->mCmdId, count, tags, values, payload);
        if (static_cast<size_t>(count) == pairs) {
            return freqRet;
        }
    } else if (pairs == 0) {
        return 0;
    }
    // Some pairs carry the platform's own on/off tag: the platform applies the action too.
    PerfExecutor* executor = mPlatPtr->mExecutorPtr;
    if (executor == nullptr) {
        return -1;
    }
    return executor->doAction(action, 1, payload) | freqRet;
}
