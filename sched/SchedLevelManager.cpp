#include "sched/SchedLevelManager.h"

#include <algorithm>
#include <cstdint>

#include "config/Action.h"
#include "config/CommandIds.h"
#include "platform/PerfExecutor.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "sched/EasGroupPrinter.h"
#include "trace/ServerTrace.h"

using velmora::kCmdDefaultSchedLevel;
using velmora::kCmdZolaFollower;
using velmora::kCmdZolaReference;

namespace {

// The platform takes at most the eight EAS groups in one call.
constexpr int kMaxGroupNum = 8;
constexpr int kMaxGroupIndex = 8;
constexpr int kFirstGroupTag = VELMORA_TAG_GROUP_HMP;
constexpr int kLastGroupTag = VELMORA_TAG_GROUP_BACKGROUND;
constexpr int kFirstEasGroupTag = VELMORA_TAG_GROUP_BOOST;
static_assert(SchedLevelManager::EasGroupValues::kGroups == kLastGroupTag - kFirstGroupTag + 1,
              "the dump's copy holds every group tag");
// Packed client levels are offset so that the low half stays non-negative.
constexpr int kLevelOffset = -velmora::kSchedLevelLowest;

constexpr int kClientKx = 1;
constexpr int kClientJn = 2;
constexpr int kClientZola = 3;

constexpr int kStepReset = 0;
constexpr int kStepDown = 1;
constexpr int kStepUp = 2;

// Pairs the action really carries: a record whose count overstates its integer pairs must not
// make us read past them.
int pairCount(const Action& action) {
    const int stored = static_cast<int>(action.mTagValues.size() / 2);
    return std::max(0, std::min(action.mParamNum, stored));
}

// Copies `from` into `to` level by level when both hold the same tags, so that the tree keeps
// its nodes (and callers' pointers into it stay valid). Falls back to a plain assignment
// otherwise.
void copyLevels(const SchedLevelManager::LevelMap& from, SchedLevelManager::LevelMap& to) {
    const bool sameTags =
        from.size() == to.size() &&
        std::equal(from.begin(), from.end(), to.begin(),
                   [](const auto& a, const auto& b) { return a.first == b.first; });
    if (!sameTags) {
        to = from;
        return;
    }
    auto dst = to.begin();
    for (const auto& entry : from) {
        (dst++)->second = entry.second;
    }
}

}  // namespace

// Holds back the helpers' publishing while an entry point runs and republishes the dump's copy
// once when it returns, on every path, while its lock is still held (declare it after the lock).
class SchedLevelManager::PublishOnReturn {
public:
    explicit PublishOnReturn(SchedLevelManager& manager) NO_THREAD_SAFETY_ANALYSIS
        : mManager(manager) {
        mManager.mPublishDeferred = true;
    }
    ~PublishOnReturn() NO_THREAD_SAFETY_ANALYSIS {
        mManager.mPublishDeferred = false;
        mManager.publishEasGroupListLocked();
    }
    PublishOnReturn(const PublishOnReturn&) = delete;
    PublishOnReturn& operator=(const PublishOnReturn&) = delete;

private:
    SchedLevelManager& mManager;
};

bool SchedLevelManager::EasGroupValues::operator==(const EasGroupValues& other) const {
    return hmpMode == other.hmpMode &&
           std::equal(&levels[0][0], &levels[0][0] + kTables * kGroups, &other.levels[0][0]);
}

SchedLevelManager::SchedLevelManager(VelmoraPlat* plat)
    : mPlatPtr(plat),
      mSchedLevelNum(0),
      mZolaFirstEventSeen(false),
      mHmpMode(false),
      mEasGroupPublished(),  // all zero, as the snapshot starts
      mPublishDeferred(false) {
    // Not yet shared with any other thread; the lock only keeps the analysis honest.
    android::Mutex::Autolock lock(mLock);
    initSchedLevelMap(mDefaultLevelMap);
    initSchedLevelMap(mCurrentLevelMap);
    initSchedLevelMap(mKxLevelMap);
    initSchedLevelMap(mJnLevelMap);
    initSchedLevelMap(mZolaLevelMap);
    initSchedLevelVec();
    initZolaSchedLevelMap(mZolaFirstEventMap);
    initZolaSchedLevelMap(mZolaEventMap);
    publishEasGroupListLocked();
}

SchedLevelManager::~SchedLevelManager() = default;

void SchedLevelManager::initSchedLevelMap(LevelMap& table) {
    for (int tag = kFirstGroupTag; tag <= kLastGroupTag; ++tag) {
        table[tag] = 0;
    }
}

void SchedLevelManager::initZolaSchedLevelMap(LevelMap& table) {
    for (int tag = kFirstGroupTag; tag <= kLastGroupTag; ++tag) {
        table[tag] = ZOLA_SCHED_LEVEL_NONE;
    }
}

void SchedLevelManager::initSchedLevelVec() {
    mSchedLevelNum = 0;
    for (int level = velmora::kSchedLevelLowest; level <= velmora::kSchedLevelHighest;
         level += velmora::kSchedLevelStep) {
        mSchedLevels[mSchedLevelNum++] = level;
    }
}

int SchedLevelManager::getSchedGroup(int config) {
    const uint32_t group = static_cast<uint32_t>(config) >> 16;
    return group <= kMaxGroupIndex ? static_cast<int>(group) : -1;
}

int SchedLevelManager::getSchedLevel(int config) {
    if (mSchedLevelNum < 1) {
        return -1;
    }
    const int level = (config & 0xFFFF) - kLevelOffset;
    if (level < mSchedLevels[0] || level > mSchedLevels[mSchedLevelNum - 1]) {
        return -1;
    }
    return level;
}

int SchedLevelManager::getIndex(int level) {
    for (int i = 0; i < mSchedLevelNum; ++i) {
        if (mSchedLevels[i] == level) {
            return i;
        }
    }
    return -1;
}

int SchedLevelManager::initDefaultSchedLevel(int tagLen, const std::vector<int>& tags, int* groups,
                                             int* levels) {
    if (static_cast<size_t>(std::max(tagLen, 0)) * 2 > tags.size()) {
        VLOGE("init default group failed! %d pairs announced, %zu values given", tagLen,
              tags.size());
        return -1;
    }
    bool hmpMode = false;
    if (tagLen == 1) {
        // A single pair can only be the hmp group; anything else is a broken configuration,
        // reported as a shape error rather than a bad group.
        if (tags[0] != VELMORA_TAG_GROUP_HMP) {
            VLOGE("init default group failed! tagLen must be (eas:%d, hmp:1)", kMaxGroupNum);
            return -1;
        }
        hmpMode = true;
    } else if (tagLen == kMaxGroupNum) {
        for (int i = 0; i < tagLen; ++i) {
            const int tag = tags[2 * i];
            if (tag < kFirstEasGroupTag || tag > kLastGroupTag) {
                VLOGE("invalid eas group, group tag is %d", tag - kFirstGroupTag);
                return -1;
            }
        }
    } else {
        VLOGE("init default group failed! tagLen must be (eas:%d, hmp:1)", kMaxGroupNum);
        return -1;
    }

    mHmpMode = hmpMode;
    for (int i = 0; i < tagLen; ++i) {
        const int tag = tags[2 * i];
        const int level = tags[2 * i + 1];
        // Re-applying the defaults also withdraws every client request.
        mDefaultLevelMap[tag] = level;
        mCurrentLevelMap[tag] = level;
        mKxLevelMap[tag] = level;
        mJnLevelMap[tag] = level;
        mZolaLevelMap[tag] = level;
        groups[i] = tag;
        levels[i] = level;
    }
    publishEasGroupListLocked();
    return 0;
}

int SchedLevelManager::doEventSchedLevel(const Action* action) {
    if (action == nullptr) {
        VLOGE("doEventSchedLevel failed, action is NULL!");
        return -1;
    }
    const int pairNum = action->mParamNum;
    if (pairNum < 1 || pairNum > kMaxGroupNum) {
        VLOGD("cmdId(%d) (duration=0): group num is invalid, max group num is %d!", action->mCmdId,
              kMaxGroupNum);
        return -1;
    }
    if (pairCount(*action) != pairNum) {
        VLOGE("cmdId(%d) (duration=0): %d pairs announced, %zu values given", action->mCmdId,
              pairNum, action->mTagValues.size());
        return -1;
    }
    for (int i = 0; i < pairNum; ++i) {
        const int tag = action->mTagValues[2 * i];
        if (tag < kFirstGroupTag || tag > kLastGroupTag) {
            VLOGD("cmdId(%d) (duration=0) does not support other tags except sched level!",
                  action->mCmdId);
            return -1;
        }
    }

    android::Mutex::Autolock lock(mLock);
    PublishOnReturn publish(*this);
    if (action->mCmdId == kCmdDefaultSchedLevel) {
        // Only recorded: the platform hears of the defaults with the next merge.
        int groups[kMaxGroupNum] = {};
        int levels[kMaxGroupNum] = {};
        return initDefaultSchedLevel(pairNum, action->mTagValues, groups, levels);
    }

    const LevelMap zolaBackup = mZolaLevelMap;
    const LevelMap currentBackup = mCurrentLevelMap;
    const LevelMap eventBackup = mZolaEventMap;
    if (updateSchedLevelMapIfNeeded(action) == 0) {
        return 0;
    }
    // A failed hand-over logs once inside, and once more after the rollback below.
    const int ret = updateCurrentSchedlevel();
    if (ret != 0) {
        // The 4114 reference is kept on purpose: the event did happen, even if the platform
        // refused its levels, and a later 4113 must compare against it.
        copyLevels(zolaBackup, mZolaLevelMap);
        copyLevels(currentBackup, mCurrentLevelMap);
        copyLevels(eventBackup, mZolaEventMap);
        VLOGD("doSchedLevelAction failed!");
    }
    return ret;
}

int SchedLevelManager::updateSchedLevelMapIfNeeded(const Action* action) {
    if (action->mCmdId == kCmdZolaReference) {
        if (!mZolaFirstEventSeen) {
            updateZolaSchedValue(action, mZolaFirstEventMap);
            mZolaFirstEventSeen = true;
        }
        updateZolaSchedValue(action, mZolaEventMap);
    } else if (action->mCmdId == kCmdZolaFollower) {
        const int pairNum = pairCount(*action);
        for (int i = 0; i < pairNum; ++i) {
            const int tag = action->mTagValues[2 * i];
            if (mZolaEventMap[tag] == mZolaFirstEventMap[tag]) {
                mZolaEventMap[tag] = action->mTagValues[2 * i + 1];
            }
        }
    } else {
        updateZolaSchedValue(action, mZolaEventMap);
    }
    return checkIfZolaLevelChanged();
}

void SchedLevelManager::updateZolaSchedValue(const Action* action, LevelMap& table) {
    if (action == nullptr) {
        return;
    }
    const int pairNum = pairCount(*action);
    for (int i = 0; i < pairNum; ++i) {
        table[action->mTagValues[2 * i]] = action->mTagValues[2 * i + 1];
    }
}

int SchedLevelManager::checkIfZolaLevelChanged() {
    // All nine groups, whatever the mode: the event levels are kept for a later 5376 that
    // switches modes.
    int changed = 0;
    for (int tag = kFirstGroupTag; tag <= kLastGroupTag; ++tag) {
        const int eventLevel = mZolaEventMap[tag];
        if (mZolaLevelMap[tag] != eventLevel) {
            mZolaLevelMap[tag] = eventLevel;
            changed = 1;
        }
    }
    if (changed != 0) {
        publishEasGroupListLocked();
    }
    return changed;
}

void SchedLevelManager::updateCurrentMapLocked(int* count, int* groups, int* levels) {
    const int firstTag = mHmpMode ? VELMORA_TAG_GROUP_HMP : kFirstEasGroupTag;
    const int lastTag = mHmpMode ? VELMORA_TAG_GROUP_HMP : kLastGroupTag;
    int written = 0;
    for (int tag = firstTag; tag <= lastTag; ++tag) {
        const int defaultLevel = mDefaultLevelMap[tag];
        // KX and JN may only hold a group below its default; when neither does, ZOLA owns the
        // group and may move it either way.
        int level = std::min({defaultLevel, mKxLevelMap[tag], mJnLevelMap[tag]});
        if (level >= defaultLevel) {
            level = mZolaLevelMap[tag];
        }
        mCurrentLevelMap[tag] = level;
        groups[written] = tag;
        levels[written] = level;
        ++written;
    }
    *count = written;
    publishEasGroupListLocked();
}

int SchedLevelManager::updateCurrentSchedlevel() {
    int count = 0;
    int groups[kMaxGroupNum] = {};
    int levels[kMaxGroupNum] = {};
    updateCurrentMapLocked(&count, groups, levels);
    PerfExecutor* executor = mPlatPtr != nullptr ? mPlatPtr->mExecutorPtr : nullptr;
    const int ret = executor != nullptr ? executor->doSchedLevelAction(count, groups, levels) : -1;
    if (ret != 0) {
        VLOGD("doSchedLevelAction failed!");
        return ret;
    }
    // Only accepted levels: a refused hand-over is rolled back by the caller.
    velmora::ServerTrace::schedLevels(count, groups, levels);
    return ret;
}

void SchedLevelManager::updateSchedLevelByOneStep(LevelMap& table, int step) {
    for (int tag = kFirstGroupTag; tag <= kLastGroupTag; ++tag) {
        // A level off the scale (set between steps, or -100) restarts from the bottom.
        const int index = getIndex(table[tag]) + step;
        const int target = mSchedLevels[std::max(0, std::min(index, mSchedLevelNum - 1))];
        table[tag] = std::min(target, mDefaultLevelMap[tag]);
    }
    publishEasGroupListLocked();
}

int SchedLevelManager::doPerfSetSchedLevel(int clientId, int tagLen, const int* tags,
                                           const int* configs) {
    LevelMap* table = getSchedLevelMap(clientId);
    if (table == nullptr) {
        return -1;
    }
    if (tagLen > 0 && (tags == nullptr || configs == nullptr)) {
        VLOGD("invalid sched level argument, clientId is %d", clientId);
        return -1;
    }

    android::Mutex::Autolock lock(mLock);
    PublishOnReturn publish(*this);
    const LevelMap tableBackup = *table;
    const LevelMap currentBackup = mCurrentLevelMap;
    if (tagLen == 1 && tags[0] == VELMORA_TAG_SCHED_LEVEL_STEP) {
        switch (configs[0]) {
            case kStepUp:
                updateSchedLevelByOneStep(*table, +1);
                break;
            case kStepDown:
                updateSchedLevelByOneStep(*table, -1);
                break;
            case kStepReset:
                copyLevels(mDefaultLevelMap, *table);
                break;
            default:
                VLOGE("invalid sched Level config is %d, clientId(%d)", configs[0], clientId);
                return -1;
        }
    } else if (tagLen >= 1 && tagLen <= kMaxGroupNum) {
        for (int i = 0; i < tagLen; ++i) {
            if (tags[i] != VELMORA_TAG_SET_SCHED_LEVEL) {
                copyLevels(tableBackup, *table);
                VLOGD("do not use VELMORA_TAG_SET_SCHED_LEVEL with other tags(%d), clientId is %d",
                      tags[i], clientId);
                return -1;
            }
            const int group = getSchedGroup(configs[i]);
            const int level = getSchedLevel(configs[i]);
            if (group < 0 || level == -1) {
                // No rollback here: earlier pairs of the request stay in the client's table
                // and reach the platform with the client's next accepted request.
                VLOGD("invalid sched Level(%d), clientId(%d)", configs[i], clientId);
                return -1;
            }
            (*table)[group + kFirstGroupTag] = level;
        }
    } else {
        VLOGD("invalid sched level argument, clientId is %d", clientId);
        return -1;
    }

    // Handed over even when no level changed, so a client can re-assert its levels.
    // A failed hand-over logs once inside, and once more after the rollback below.
    const int ret = updateCurrentSchedlevel();
    if (ret != 0) {
        copyLevels(tableBackup, *table);
        copyLevels(currentBackup, mCurrentLevelMap);
        VLOGD("doSchedLevelAction failed!");
    }
    return ret;
}

SchedLevelManager::LevelMap* SchedLevelManager::getSchedLevelMap(int clientId) {
    // Hands out the table itself; callers that change it must hold mLock.
    switch (clientId) {
        case kClientKx:
            return &mKxLevelMap;
        case kClientJn:
            return &mJnLevelMap;
        case kClientZola:
            return &mZolaLevelMap;
        default:
            VLOGE("invalid clientId is %d", clientId);
            return nullptr;
    }
}

void SchedLevelManager::dumpEasGroupList(android::String8& out) {
    // The published copy, never the tables: a dump must neither race with a request nor wait
    // behind the platform call that a request makes under mLock.
    static const char* const kHeadings[EasGroupValues::kTables] = {
        "default eas group value is:\n", "current eas group value is:\n",
        "KX set eas group value is:\n", "JN set eas group value is:\n",
        "ZOLA set eas group value is:\n"};
    const EasGroupValues values = mEasGroupSnapshot.read();
    for (int t = 0; t < EasGroupValues::kTables; ++t) {
        LevelMap table;
        for (int g = 0; g < EasGroupValues::kGroups; ++g) {
            table[kFirstGroupTag + g] = values.levels[t][g];
        }
        out.append(kHeadings[t]);
        velmora::EasGroupPrinter::print(table, values.hmpMode, out);
    }
}

void SchedLevelManager::publishEasGroupListLocked() {
    if (mPublishDeferred) {
        return;
    }
    const LevelMap* const tables[EasGroupValues::kTables] = {
        &mDefaultLevelMap, &mCurrentLevelMap, &mKxLevelMap, &mJnLevelMap, &mZolaLevelMap};
    EasGroupValues values;
    for (int t = 0; t < EasGroupValues::kTables; ++t) {
        for (int g = 0; g < EasGroupValues::kGroups; ++g) {
            const auto it = tables[t]->find(kFirstGroupTag + g);
            values.levels[t][g] = it != tables[t]->end() ? it->second : 0;
        }
    }
    values.hmpMode = mHmpMode;
    if (values == mEasGroupPublished) {
        return;
    }
    mEasGroupPublished = values;
    mEasGroupSnapshot.publish(values);
}

void SchedLevelManager::printEasGroupList(LevelMap& table, android::String8& out) {
    velmora::EasGroupPrinter::print(table, mHmpMode, out);
}

SchedLevelManager* getSchedLevel(VelmoraPlat* plat) {
    return new SchedLevelManager(plat);
}
