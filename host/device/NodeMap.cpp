#include "host/device/NodeMap.h"

#include <sstream>

#include "config/Tags.h"
#include "host/device/profile/DeviceProfile.h"
#include "host/text/TextFile.h"

namespace velmora {

namespace {

struct TagKey {
    int tag;
    const char* key;
};

// Tags 51..58 are the EAS groups (schedtune); tag 50, the single hmp group, is a kernel tunable.
const TagKey kTagKeys[] = {
    {VELMORA_TAG_LITTLE_CPU_MIN_FREQ, "cpu.little.min"},
    {VELMORA_TAG_LITTLE_CPU_MAX_FREQ, "cpu.little.max"},
    {VELMORA_TAG_BIG_CPU_MIN_FREQ, "cpu.big.min"},
    {VELMORA_TAG_BIG_CPU_MAX_FREQ, "cpu.big.max"},
    {VELMORA_TAG_GPU_MIN_FREQ, "gpu.min"},
    {VELMORA_TAG_GPU_MAX_FREQ, "gpu.max"},
    {kTagDdrMinFreq, "ddr.min"},
    {VELMORA_TAG_IPA_SWITCH_TEMP, "ipa.switch_temp"},
    {VELMORA_TAG_IPA_CONTROL_TEMP, "ipa.control_temp"},
    {VELMORA_TAG_IPA_SUSTAINABLE_POWER, "ipa.sustainable_power"},
    {VELMORA_TAG_FORK_ON_BIG_CLUSTER, "sched.fork_on_big"},
    {VELMORA_TAG_LITTLE_CPU_TOP_FREQ, "cpu.little.top"},
    {VELMORA_TAG_BIG_CPU_TOP_FREQ, "cpu.big.top"},
    {VELMORA_TAG_GPU_TOP_FREQ, "gpu.top"},
    {VELMORA_TAG_GROUP_HMP, "sched.group.hmp"},
    {VELMORA_TAG_GROUP_BOOST, "sched.group.boost"},
    {VELMORA_TAG_GROUP_VIP, "sched.group.vip"},
    {VELMORA_TAG_GROUP_TOP_APP, "sched.group.top_app"},
    {VELMORA_TAG_GROUP_ROOT, "sched.group.root"},
    {VELMORA_TAG_GROUP_FOREGROUND, "sched.group.foreground"},
    {VELMORA_TAG_GROUP_SYSTEM_BACKGROUND, "sched.group.system_background"},
    {VELMORA_TAG_GROUP_KEY_BACKGROUND, "sched.group.key_background"},
    {VELMORA_TAG_GROUP_BACKGROUND, "sched.group.background"},
};

}  // namespace

NodeMap::NodeMap() : NodeMap(DeviceProfile::builtIn()) {}

NodeMap::NodeMap(const DeviceProfile& profile) {
    useProfile(profile);
    initTagKeys();
}

void NodeMap::useProfile(const DeviceProfile& profile) {
    mNodes = profile.nodes();
    mIndex.clear();
    for (size_t i = 0; i < mNodes.size(); ++i) {
        mIndex[mNodes[i].key] = i;
    }
}

void NodeMap::initTagKeys() {
    for (const auto& entry : kTagKeys) {
        mTagKeys[entry.tag] = entry.key;
    }
}

const NodeSpec* NodeMap::find(const std::string& key) const {
    auto it = mIndex.find(key);
    return it == mIndex.end() ? nullptr : &mNodes[it->second];
}

const std::string& NodeMap::keyForTag(int tag) const {
    static const std::string kNone;
    auto it = mTagKeys.find(tag);
    return it == mTagKeys.end() ? kNone : it->second;
}

int NodeMap::parse(const std::string& text, const std::string& origin, std::string* error) {
    std::istringstream in(text);
    std::string line;
    int lineNo = 0;
    while (std::getline(in, line)) {
        ++lineNo;
        const size_t hash = line.find('#');
        if (hash != std::string::npos) {
            line.erase(hash);
        }
        std::istringstream words(line);
        std::string key, path, seed, extra;
        if (!(words >> key)) {
            continue;
        }
        const std::string where = origin + ":" + std::to_string(lineNo) + ": ";
        if (!(words >> path)) {
            if (error != nullptr)
                *error = where + "missing path for node '" + key + "'";
            return -1;
        }
        words >> seed;
        if (words >> extra) {
            if (error != nullptr)
                *error = where + "unexpected text '" + extra + "'";
            return -1;
        }
        if (!path.empty() && path[0] == '/') {
            path.erase(0, path.find_first_not_of('/'));
        }
        if (path.empty() || path.find("..") != std::string::npos) {
            if (error != nullptr)
                *error = where + "bad path for node '" + key + "'";
            return -1;
        }
        auto it = mNodes.begin();
        while (it != mNodes.end() && it->key != key) {
            ++it;
        }
        if (it == mNodes.end()) {
            if (error != nullptr)
                *error = where + "unknown node '" + key + "'";
            return -1;
        }
        it->path = path;
        if (!seed.empty()) {
            it->seed = seed;
        }
    }
    return 0;
}

int NodeMap::load(const std::string& path, std::string* error) {
    return TextFile::parseFile(
        path, "node map", [&](const std::string& text) { return parse(text, path, error); }, error);
}

}  // namespace velmora
