#include "freq/FreqClientManager.h"

#include <algorithm>
#include <vector>

#include "platform/PerfExecutor.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "trace/ServerTrace.h"

namespace {

// Merged tags in dump order, with their labels (all the same width so the values line up).
struct DumpRow {
    int32_t tag;
    const char* label;
};
constexpr DumpRow kDumpRows[] = {
    {VELMORA_TAG_LITTLE_CPU_MAX_FREQ, "little cpu max,       "},
    {VELMORA_TAG_BIG_CPU_MAX_FREQ, "big cpu max,          "},
    {VELMORA_TAG_GPU_MAX_FREQ, "gpu max,              "},
    {VELMORA_TAG_IPA_SWITCH_TEMP, "ipa switch temp,      "},
    {VELMORA_TAG_IPA_CONTROL_TEMP, "ipa control temp,     "},
    {VELMORA_TAG_IPA_SUSTAINABLE_POWER, "ipa sustainable power,"},
    {VELMORA_TAG_FORK_ON_BIG_CLUSTER, "fork on big cluster,  "},
};
static_assert(sizeof(kDumpRows) / sizeof(kDumpRows[0]) == FreqClientManager::kFreqListTags,
              "one dump row per merged tag");

// Client requests rarely carry more tags than an event; larger ones spill to the heap.
constexpr int kInlineRequestTags = MAX_EVENT_TAGS;

bool isEventFloorTag(int tag) {
    return tag == VELMORA_TAG_LITTLE_CPU_MIN_FREQ || tag == VELMORA_TAG_BIG_CPU_MIN_FREQ ||
           tag == VELMORA_TAG_GPU_MIN_FREQ;
}

bool isEventCapTag(int tag) {
    return tag == VELMORA_TAG_LITTLE_CPU_MAX_FREQ || tag == VELMORA_TAG_BIG_CPU_MAX_FREQ ||
           tag == VELMORA_TAG_GPU_MAX_FREQ;
}

int valueOr0(const FreqClientManager::TagMap& map, int tag) {
    auto it = map.find(tag);
    return it == map.end() ? 0 : it->second;
}

// Hands a merged configuration to the platform; both request paths log a refusal alike, and
// both trace what the platform accepted.
int applyConfig(PerfExecutor* exec, int id, int count, const int* tags, const int* values) {
    const int ret = exec != nullptr ? exec->doPerfSetConfig(id, count, tags, values) : -1;
    if (ret != 0) {
        VLOGE("doPerfSetConfig failed!");
        return ret;
    }
    velmora::ServerTrace::freqLimits(count, tags, values);
    return ret;
}

}  // namespace

FreqClientManager::FreqClientManager(VelmoraPlat* plat)
    : mPlatPtr(plat), mMaxFreqRead(false), mUploadEnabled(false), mFreqListPublished() {
    initConfigSet();
    initFreqMap();
    // Not yet shared with any other thread; the lock only keeps the analysis honest.
    android::Mutex::Autolock lock(mLock);
    initConfigMap(mKxConfigMap);
    initConfigMap(mJnConfigMap);
    initConfigMap(mZolaConfigMap);
    initConfigMap(mMinConfigMap);
}

FreqClientManager::~FreqClientManager() = default;

void FreqClientManager::initConfigSet() {
    for (const DumpRow& row : kDumpRows) {
        mConfigSet.insert(row.tag);
    }
}

void FreqClientManager::initConfigMap(TagMap& table) {
    for (const DumpRow& row : kDumpRows) {
        table[row.tag] = -1;
    }
    if (isClientTable(table)) {
        publishFreqListLocked();
    }
}

bool FreqClientManager::isClientTable(const TagMap& table) const {
    return &table == &mKxConfigMap || &table == &mJnConfigMap || &table == &mZolaConfigMap;
}

void FreqClientManager::initFreqMap() {
    mFreqMap[VELMORA_TAG_LITTLE_CPU_MIN_FREQ] = &mLittleMinFreqMap;
    mFreqMap[VELMORA_TAG_LITTLE_CPU_MAX_FREQ] = &mLittleMaxFreqMap;
    mFreqMap[VELMORA_TAG_BIG_CPU_MIN_FREQ] = &mBigMinFreqMap;
    mFreqMap[VELMORA_TAG_BIG_CPU_MAX_FREQ] = &mBigMaxFreqMap;
    mFreqMap[VELMORA_TAG_GPU_MIN_FREQ] = &mGpuMinFreqMap;
    mFreqMap[VELMORA_TAG_GPU_MAX_FREQ] = &mGpuMaxFreqMap;
}

PerfExecutor* FreqClientManager::executor() const {
    return mPlatPtr != nullptr ? mPlatPtr->mExecutorPtr : nullptr;
}

FreqClientManager::TagMap* FreqClientManager::clientTable(int clientId) {
    switch (clientId) {
        case VELMORA_CLIENT_KX:
            return &mKxConfigMap;
        case VELMORA_CLIENT_JN:
            return &mJnConfigMap;
        case VELMORA_CLIENT_ZOLA:
            return &mZolaConfigMap;
        default:
            return nullptr;
    }
}

int FreqClientManager::doPerfSetConfig(int id, int tagLen, const int* tags, const int* configs,
                                       const int* onOff) {
    android::Mutex::Autolock lock(mLock);
    if (id == VELMORA_CLIENT_FEATURE_SWITCH) {
        enableFreqInfoUpload(tagLen, tags, configs);
        return 0;
    }
    // The outgoing arrays are sized by tagLen and both input arrays are read in full.
    if (tagLen < 0 || (tagLen > 0 && (tags == nullptr || configs == nullptr))) {
        VLOGE("invalid request, id=%d, tagLen=%d", id, tagLen);
        return -1;
    }
    if (id > VELMORA_CLIENT_ZOLA) {
        if (onOff == nullptr) {
            return -1;
        }
        return doPerfEventConfig(id, tagLen, tags, configs, *onOff);
    }

    int inlineTags[kInlineRequestTags];
    int inlineValues[kInlineRequestTags];
    std::vector<int> spill;
    int* outTags = inlineTags;
    int* outValues = inlineValues;
    if (tagLen > kInlineRequestTags) {
        spill.resize(2 * static_cast<size_t>(tagLen));
        outTags = spill.data();
        outValues = spill.data() + tagLen;
    }

    for (int i = 0; i < tagLen; ++i) {
        const int config = configs[i];
        if (config < 0) {
            VLOGE("invalid config value(%d)", config);
            return -1;
        }
        const int tag = tags[i];
        outTags[i] = tag;
        if (mConfigSet.count(tag) == 0) {
            outValues[i] = config;
            continue;
        }
        const int merged = getNewConfig(id, tag, config);
        // Recorded before the platform is asked so that an invalid fork request leaves -1 behind.
        mMinConfigMap[tag] = merged;
        outValues[i] = getConfigWithSceneEvent(merged, tag);
        if (outValues[i] == -1) {
            return -1;
        }
    }

    const int ret = applyConfig(executor(), id, tagLen, outTags, outValues);
    if (ret != 0) {
        return ret;
    }
    // The platform has applied the request by now, so even an unknown id counts as success.
    cacheTags(id, tagLen, tags, configs);

    if (!mUploadEnabled) {
        return 0;
    }
    if (!mMaxFreqRead) {
        if (readMaxFreq() != 0) {
            return 0;  // retried with the next request
        }
        mMaxFreqRead = true;
    }
    mFreqInfoUpload.updateOriginFreqData(id, tagLen, tags, configs);
    mFreqInfoUpload.updateFinalFreqData(id, tagLen, outTags, outValues);
    return 0;
}

void FreqClientManager::enableFreqInfoUpload(int tagLen, const int* tags, const int* configs) {
    if (tagLen == 1 && tags != nullptr && configs != nullptr &&
        tags[0] == VELMORA_TAG_FEATURE_SWITCH && (configs[0] & FREQ_INFO_UPLOAD_BIT) != 0 &&
        !mUploadEnabled) {
        mUploadEnabled = true;
    }
}

void FreqClientManager::cacheTags(int clientId, int tagLen, const int* tags, const int* configs) {
    TagMap* table = clientTable(clientId);
    if (table == nullptr) {
        VLOGE("invalid clientId is %d", clientId);
        return;
    }
    updateConfigMap(tagLen, tags, configs, *table);
}

void FreqClientManager::publishFreqListLocked() {
    const TagMap* const tables[kFreqListClients] = {&mKxConfigMap, &mJnConfigMap, &mZolaConfigMap};
    FreqListValues values;
    for (int c = 0; c < kFreqListClients; ++c) {
        for (int row = 0; row < kFreqListTags; ++row) {
            values[c][row] = valueOr0(*tables[c], kDumpRows[row].tag);
        }
    }
    if (values == mFreqListPublished) {
        return;
    }
    mFreqListPublished = values;
    mFreqListSnapshot.publish(values);
}

void FreqClientManager::updateConfigMap(int tagLen, const int* tags, const int* configs,
                                        TagMap& table) {
    for (int i = 0; i < tagLen; ++i) {
        if (mConfigSet.count(tags[i]) != 0) {
            table[tags[i]] = configs[i];
        }
    }
    if (isClientTable(table)) {
        publishFreqListLocked();
    }
}

int FreqClientManager::readMaxFreq() {
    const int tags[] = {VELMORA_TAG_LITTLE_CPU_TOP_FREQ, VELMORA_TAG_BIG_CPU_TOP_FREQ,
                        VELMORA_TAG_GPU_TOP_FREQ};
    int values[] = {-1, -1, -1};
    PerfExecutor* exec = executor();
    if (exec == nullptr) {
        VLOGE("getConfig failed!");
        return -1;
    }
    const int ret = exec->doPerfGetConfig(3, tags, values);
    if (ret != 0) {
        VLOGE("getConfig failed!");
        return ret;
    }
    mFreqInfoUpload.updateMaxFreqData(values[0], values[1], values[2]);
    return 0;
}

int FreqClientManager::doPerfEventConfig(int cmdId, int tagLen, const int* tags, const int* configs,
                                         int onOff) {
    // The server never sends more; refusing keeps the fixed result array in bounds.
    if (tagLen > MAX_EVENT_TAGS) {
        VLOGE("too many tags %d, cmdId is %d", tagLen, cmdId);
        return -1;
    }
    TagMap effective;
    TagMap requested;
    int result[MAX_EVENT_TAGS];
    for (int i = 0; i < tagLen; ++i) {
        const int tag = tags[i];
        const int freq = configs[i];
        int value;
        if (isEventFloorTag(tag)) {
            value = getMaxFreqFromMap(cmdId, onOff, freq, *mFreqMap[tag]);
        } else if (isEventCapTag(tag)) {
            value = getMinFreqFromMap(cmdId, onOff, tag, freq, *mFreqMap[tag]);
        } else {
            VLOGE("invalid tag %d, cmdId is %d", tag, cmdId);
            return -1;
        }
        result[i] = value;
        effective[tag] = value;
        requested[tag] = freq;
    }

    // A switch-off is recorded even if the remaining limits turn out inconsistent: the event is
    // gone either way.
    if (onOff == -1) {
        saveDataToMap(cmdId, onOff, requested);
    }
    const int l1 = valueOr0(effective, VELMORA_TAG_LITTLE_CPU_MIN_FREQ);
    const int l2 = valueOr0(effective, VELMORA_TAG_LITTLE_CPU_MAX_FREQ);
    const int b1 = valueOr0(effective, VELMORA_TAG_BIG_CPU_MIN_FREQ);
    const int b2 = valueOr0(effective, VELMORA_TAG_BIG_CPU_MAX_FREQ);
    const int g1 = valueOr0(effective, VELMORA_TAG_GPU_MIN_FREQ);
    const int g2 = valueOr0(effective, VELMORA_TAG_GPU_MAX_FREQ);
    if (!isFreqValValid(l1, l2) || !isFreqValValid(b1, b2) || !isFreqValValid(g1, g2)) {
        VLOGI(
            "freq is invalid(min > freq), cmdId is %d, (l_cpu(%d,%d), b_cpu(%d, %d), "
            "gpu(%d, %d))",
            cmdId, l1, l2, b1, b2, g1, g2);
        return -1;
    }
    if (onOff == 0) {
        saveDataToMap(cmdId, onOff, requested);
    }

    return applyConfig(executor(), cmdId, tagLen, tags, result);
}

void FreqClientManager::setMapFreq(int cmdId, int tag, int value) {
    auto it = mFreqMap.find(tag);
    if (it != mFreqMap.end()) {
        (*it->second)[cmdId] = value;
    }
}

void FreqClientManager::saveDataToMap(int cmdId, int onOff, const TagMap& requested) {
    for (const auto& entry : requested) {
        if (entry.second >= 1) {
            setMapFreq(cmdId, entry.first, onOff == 0 ? entry.second : 0);
        }
    }
}

int FreqClientManager::getValidMinValue(int a, int b) {
    if (a >= 1) {
        return b > 0 ? std::min(a, b) : a;
    }
    return (b > 0 || a != 0) ? b : a;
}

int FreqClientManager::getTaskForkMinValue(int a, int b) {
    if (a >= 1) {
        return b >= 0 ? b : a;
    }
    return a == 0 ? 0 : b;
}

int FreqClientManager::getMinTagConfigs(int clientId, int tag) {
    TagMap* first;
    TagMap* second;
    switch (clientId) {
        case VELMORA_CLIENT_KX:
            first = &mJnConfigMap;
            second = &mZolaConfigMap;
            break;
        case VELMORA_CLIENT_JN:
            first = &mKxConfigMap;
            second = &mZolaConfigMap;
            break;
        case VELMORA_CLIENT_ZOLA:
            first = &mKxConfigMap;
            second = &mJnConfigMap;
            break;
        default:
            VLOGE("invalid clientId is %d", clientId);
            return -1;
    }
    const int a = (*first)[tag];
    const int b = (*second)[tag];
    if (tag == VELMORA_TAG_FORK_ON_BIG_CLUSTER) {
        return getTaskForkMinValue(a, b);
    }
    return getValidMinValue(a, b);
}

int FreqClientManager::getNewConfig(int clientId, int tag, int config) {
    if (tag != VELMORA_TAG_FORK_ON_BIG_CLUSTER) {
        const int m = getMinTagConfigs(clientId, tag);
        return (m >= 1 && (config == 0 || (config >= 1 && m < config))) ? m : config;
    }
    if (config == 0) {
        return 0;
    }
    if (config == 1) {
        const int m = getMinTagConfigs(clientId, tag);
        return (m == -1 || m == 1) ? 1 : m;
    }
    VLOGE("invalid config(%d), tag is %d", config, tag);
    return -1;
}

int FreqClientManager::getMinConfig(const EventMap& table) {
    int32_t min = kNoCap;
    for (const auto& entry : table) {
        if (entry.second > 0 && entry.second < min) {
            min = entry.second;
        }
    }
    return min == kNoCap ? 0 : min;
}

int FreqClientManager::getSceneConfig(int tag) {
    if (!isEventCapTag(tag)) {
        return 0;
    }
    return getMinConfig(*mFreqMap[tag]);
}

int FreqClientManager::getConfigWithSceneEvent(int config, int tag) {
    const int s = getSceneConfig(tag);
    return (s >= 1 && (config == 0 || (config >= 1 && s < config))) ? s : config;
}

int FreqClientManager::getMinFreqFromMap(int cmdId, int onOff, int tag, int freq,
                                         const EventMap& table) {
    int32_t min = kNoCap;
    for (const auto& entry : table) {
        if (entry.first != cmdId && entry.second >= 1 && entry.second < min) {
            min = entry.second;
        }
    }
    const int clients = mMinConfigMap[tag];
    if (clients >= 1 && clients < min) {
        min = clients;
    }
    if (onOff != 0) {
        return min == kNoCap ? 0 : min;
    }
    // The event's own value is taken as is, so a 0 (no cap) still wins here.
    return min <= freq ? min : freq;
}

int FreqClientManager::getMaxFreqFromMap(int cmdId, int onOff, int freq, const EventMap& table) {
    if (table.empty()) {
        return (freq > 0 && onOff == 0) ? freq : 0;
    }
    int max = 0;
    for (const auto& entry : table) {
        if (entry.first != cmdId && entry.second > max) {
            max = entry.second;
        }
    }
    return (max < freq && onOff == 0) ? freq : max;
}

bool FreqClientManager::isFreqValValid(int minFreq, int maxFreq) {
    return minFreq <= maxFreq || minFreq < 1 || maxFreq < 1;
}

// The dump runs on the dump caller's thread and reads the published copy, never the tables: a
// debugging aid must neither race with a request nor block behind a stuck platform call.
void FreqClientManager::dumpFreqList(android::String8& out) {
    static const char* const kHeadings[kFreqListClients] = {
        "KX set freq is:\n", "JN set freq is:\n", "ZOLA set freq is:\n"};
    const FreqListValues values = mFreqListSnapshot.read();
    for (int c = 0; c < kFreqListClients; ++c) {
        TagMap table;
        for (int row = 0; row < kFreqListTags; ++row) {
            table[kDumpRows[row].tag] = values[c][row];
        }
        out.append(kHeadings[c]);
        printFreqList(table, out);
    }
}

void FreqClientManager::printFreqList(TagMap& table, android::String8& out) {
    for (const DumpRow& row : kDumpRows) {
        out.appendFormat("tag=%s value=%d\n", row.label, table[row.tag]);
    }
}

FreqClientManager* getFreqClient(VelmoraPlat* plat) {
    return new FreqClientManager(plat);
}
