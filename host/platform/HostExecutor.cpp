#include "host/platform/HostExecutor.h"

#include <cstdlib>

#include "config/Action.h"
#include "config/CommandIds.h"
#include "config/CommandKind.h"
#include "config/Tags.h"
#include "host/vocabulary/ParamVocabulary.h"
#include "platform/VelmoraLog.h"

namespace velmora {

namespace {

constexpr int kProbeCmdId = kCmdProbe;
constexpr int kPriorityTag = kTagScenePriority;
constexpr int kForkOnBigTag = VELMORA_TAG_FORK_ON_BIG_CLUSTER;
constexpr int kNoSchedLevel = ZOLA_SCHED_LEVEL_NONE;  // group level of "nothing requested"
// Source names as strings once: they are passed for every node of every request.
const std::string kFreqSource = "freq";
const std::string kSchedSource = "sched";
const std::string kProbeSource = "probe";

// Kind of a command as far as its lifetime goes; also the timeline category of its instants.
const char* categoryOf(int cmdId) {
    switch (classify(cmdId)) {
        case CommandKind::kSpecialScene:
        case CommandKind::kGovernorScene:
            return "scene";
        case CommandKind::kOnOff:
            return "onoff";
        case CommandKind::kMemoryLatency:
            return "memlat";
        default:
            return "action";
    }
}

std::string describe(const Action& action) {
    return std::to_string(action.mCmdId) + " " + action.mName;
}

}  // namespace

HostExecutor::HostExecutor(const NodeMap& nodes, DeviceTree& tree, HostClock& clock,
                           Timeline& timeline)
    : mNodes(nodes),
      mTree(tree),
      mTimeline(timeline),
      mResolver(nodes, tree, &timeline),
      mTimers(clock, [this](int cmdId) { onExpire(cmdId); }) {}

HostExecutor::~HostExecutor() = default;

NodeResolver::Requests HostExecutor::requestsOf(const Action& action) {
    NodeResolver::Requests requests;
    auto addInt = [&](int tag, long long value) {
        if (tag == kPriorityTag) {
            return;  // read by the server's arbitration, nothing to write
        }
        const std::string& key = mNodes.keyForTag(tag);
        const NodeSpec* spec = key.empty() ? nullptr : mNodes.find(key);
        if (spec == nullptr) {
            VLOGW("host: cmdId=%d: tag %d has no node, ignored", action.mCmdId, tag);
            return;
        }
        if ((spec->kind == NodeKind::Floor || spec->kind == NodeKind::Cap) && value <= 0) {
            return;  // 0 is "no limit"
        }
        requests.emplace_back(key, std::to_string(value));
    };
    for (size_t i = 0; i + 1 < action.mTagValues.size(); i += 2) {
        addInt(action.mTagValues[i], action.mTagValues[i + 1]);
    }
    for (size_t i = 0; i + 1 < action.mParams.size(); i += 2) {
        const std::string& name = action.mParams[i];
        const std::string& text = action.mParams[i + 1];
        const std::string textKey = ParamVocabulary::textNodeForName(name);
        if (!textKey.empty()) {
            requests.emplace_back(textKey, text);
            continue;
        }
        int value = 0;
        const int tag = ParamVocabulary::tagForName(name);
        if (tag >= 0 && ParamVocabulary::parseInt(text, &value)) {
            addInt(tag, value);
        } else {
            VLOGW("host: cmdId=%d: parameter %s=%s not understood, ignored", action.mCmdId,
                  name.c_str(), text.c_str());
        }
    }
    return requests;
}

int HostExecutor::doAction(const Action* action, unsigned int payloadNum, const int* payload) {
    if (action == nullptr) {
        VLOGE("host: doAction without action");
        return -1;
    }
    const bool withdraw = payload != nullptr && payloadNum >= 1 && payload[0] == -1;
    std::lock_guard<std::mutex> lock(mLock);
    const int cmdId = action->mCmdId;
    if (cmdId == kProbeCmdId) {
        return doProbeAction(*action, withdraw);
    }
    const std::string source = "cmd:" + std::to_string(cmdId);
    const std::string category = categoryOf(cmdId);
    const bool timed = category == "action" && action->mDuration > 0;
    if (withdraw) {
        if (timed || mTimers.armed(cmdId)) {
            mTimers.cancel(cmdId);
        }
        const int ret = mResolver.clearSource(source);
        if (mApplied.erase(cmdId) != 0) {
            mTimeline.recordInstant(category, describe(*action) + " off");
            if (mObserver != nullptr)
                mObserver->onCommandWithdrawn(cmdId, /*expired=*/false);
        }
        return ret;
    }
    if (mObserver != nullptr) {
        // Before the nodes change, so that their new holder is known by name.
        mObserver->onCommandApplied(cmdId, category, action->mName, timed ? action->mDuration : 0);
    }
    const int ret = mResolver.replaceSource(source, requestsOf(*action));
    if (timed) {
        mTimers.arm(cmdId, action->mDuration);
        mTimeline.recordInstant(
            category, describe(*action) + " for " + std::to_string(action->mDuration) + " ms");
    } else if (mApplied.count(cmdId) == 0) {
        mTimeline.recordInstant(category, describe(*action) + " on");
    }
    mApplied.insert(cmdId);
    return ret;
}

int HostExecutor::doProbeAction(const Action& action, bool withdraw) {
    const std::string tid = std::to_string(mProbeTid);
    const bool changed =
        withdraw ? mBoosted.erase(mProbeTid) != 0 : mBoosted.insert(mProbeTid).second;
    if (changed && mObserver != nullptr) {
        mObserver->onProbeBoost(mProbeTid, !withdraw);
    }
    if (mBoosted.empty()) {
        return mResolver.clearSource(kProbeSource);
    }
    NodeResolver::Requests requests = requestsOf(action);
    requests.emplace_back("probe.tid", withdraw ? std::to_string(*mBoosted.rbegin()) : tid);
    requests.emplace_back("probe.threads", std::to_string(mBoosted.size()));
    return mResolver.replaceSource(kProbeSource, requests);
}

void HostExecutor::onExpire(int cmdId) {
    std::lock_guard<std::mutex> lock(mLock);
    if (mTimers.armed(cmdId)) {
        return;  // re-armed after it fell due: the fresh application stays
    }
    if (mObserver != nullptr && mApplied.count(cmdId) != 0) {
        mObserver->onCommandWithdrawn(cmdId, /*expired=*/true);
    }
    mResolver.clearSource("cmd:" + std::to_string(cmdId));
    if (mApplied.erase(cmdId) != 0) {
        mTimeline.recordInstant("action", std::to_string(cmdId) + " expired");
    }
}

int HostExecutor::doPerfSetConfig(int id, int count, const int* tags, const int* values) {
    if (count > 0 && (tags == nullptr || values == nullptr)) {
        return -1;
    }
    std::lock_guard<std::mutex> lock(mLock);
    int ret = 0;
    for (int i = 0; i < count; ++i) {
        const std::string& key = mNodes.keyForTag(tags[i]);
        if (key.empty() || isTopFreqTag(tags[i])) {
            VLOGW("host: setConfig id=%d: tag %d cannot be set, ignored", id, tags[i]);
            ret = -1;
            continue;
        }
        // Merged values: 0 releases a limit (fork-on-big excepted, where 0 is a setting),
        // -1 was never set.
        const bool release = values[i] < 0 || (values[i] == 0 && tags[i] != kForkOnBigTag);
        if (mObserver != nullptr) {
            mObserver->onFreqConfig(id, key, release ? 0 : values[i]);
        }
        ret |= release ? mResolver.clear(key, kFreqSource)
                       : mResolver.set(key, kFreqSource, std::to_string(values[i]));
    }
    return ret;
}

int HostExecutor::doPerfGetConfig(int count, const int* tags, int* values) {
    if (count > 0 && (tags == nullptr || values == nullptr)) {
        return -1;
    }
    int ret = 0;
    for (int i = 0; i < count; ++i) {
        const std::string& key = mNodes.keyForTag(tags[i]);
        std::string text;
        if (key.empty() || !mTree.read(key, &text)) {
            VLOGW("host: getConfig: tag %d has no readable node", tags[i]);
            ret = -1;
            continue;
        }
        values[i] = static_cast<int>(strtoll(text.c_str(), nullptr, 10));
    }
    return ret;
}

int HostExecutor::doSchedLevelAction(int count, const int* groups, const int* levels) {
    if (count > 0 && (groups == nullptr || levels == nullptr)) {
        return -1;
    }
    std::lock_guard<std::mutex> lock(mLock);
    int ret = 0;
    for (int i = 0; i < count; ++i) {
        static const std::string kNoKey;
        const std::string& key = isGroupTag(groups[i]) ? mNodes.keyForTag(groups[i]) : kNoKey;
        if (key.empty()) {
            VLOGW("host: sched level for unknown group tag %d, ignored", groups[i]);
            ret = -1;
            continue;
        }
        ret |= levels[i] == kNoSchedLevel
                   ? mResolver.clear(key, kSchedSource)
                   : mResolver.set(key, kSchedSource, std::to_string(levels[i]));
    }
    return ret;
}

int HostExecutor::setProbeTid(unsigned int tid, int state) {
    (void)state;  // the following doAction says whether it boosts or withdraws
    std::lock_guard<std::mutex> lock(mLock);
    mProbeTid = tid;
    return 0;
}

void HostExecutor::setObserver(ExecutorObserver* observer) {
    std::lock_guard<std::mutex> lock(mLock);
    mObserver = observer;
    mResolver.setObserver(observer);
}

bool HostExecutor::timedActionPending(int cmdId) const {
    return mTimers.armed(cmdId);
}

size_t HostExecutor::boostedThreads() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mBoosted.size();
}

}  // namespace velmora
